// Edges of the Bessel family that follow from definitions and parity rather than from a reference
// library: limits at 0 and infinity, the sign rules, the screens, and the result pointers.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "twanlys/special.h"
#include "twrt.h"

namespace {

constexpr double kInf = std::numeric_limits<double>::infinity();
const double kNaN = std::numeric_limits<double>::quiet_NaN();

template <class F, class... A>
double Call(F f, A... args) {
    double out = -12345.0;
    f(args..., &out);
    return out;
}

struct Case {
    std::string what;
    std::function<double()> call;
    std::function<double()> expected;  // NaN: any NaN
};

TEST(BesselFamily, EdgesAndSignRules) {
    // Closed forms at half-integer orders and the stated edges; the wider screens and parity are
    // checked in the reference suite.
    const std::vector<Case> cases = {
        // j_0 = sin x / x, y_0 = -cos x / x, I_1/2 = sqrt(2 / pi x) sinh x, I_-1/2 with cosh
        {"j_0(2)", [] { return Call(TW_BesselJs, 0, 2.0); }, [] { return std::sin(2.0) / 2.0; }},
        {"y_0(20)", [] { return Call(TW_BesselYs, 0, 20.0); }, [] { return -std::cos(20.0) / 20.0; }},
        {"I_0.5(3)", [] { return Call(TW_BesselIr, 0.5, 3.0); }, [] { return std::sqrt(2.0 / (M_PI * 3.0)) * std::sinh(3.0); }},
        {"I_-0.5(3)", [] { return Call(TW_BesselIr, -0.5, 3.0); }, [] { return std::sqrt(2.0 / (M_PI * 3.0)) * std::cosh(3.0); }},
        {"J_0(0)", [] { return Call(TW_BesselJr, 0.0, 0.0); }, [] { return 1.0; }},
        {"J_2(-1) = J_2(1)", [] { return Call(TW_BesselJr, 2.0, -1.0); }, [] { return Call(TW_BesselJr, 2.0, 1.0); }},
        {"J_3(-1) = -J_3(1)", [] { return Call(TW_BesselJr, 3.0, -1.0); }, [] { return -Call(TW_BesselJr, 3.0, 1.0); }},
        {"J_0.5(-1)", [] { return Call(TW_BesselJr, 0.5, -1.0); }, [] { return kNaN; }},
        {"Y_0.5(0)", [] { return Call(TW_BesselYr, 0.5, 0.0); }, [] { return kNaN; }},
        {"y_0(0)", [] { return Call(TW_BesselYs, 0, 0.0); }, [] { return -kInf; }},
        {"I_-0.5(0)", [] { return Call(TW_BesselIr, -0.5, 0.0); }, [] { return kInf; }},
    };
    for (const Case& c : cases) {
        const double got = c.call();
        const double want = c.expected();
        if (std::isnan(want))
            EXPECT_TRUE(std::isnan(got)) << c.what << " gave " << got;
        else if (std::isinf(want) || want == 0.0)
            EXPECT_EQ(got, want) << c.what;
        else
            EXPECT_NEAR(got, want, 8e-16 * std::fabs(want)) << c.what;
    }
}

TEST(BesselFamily, AiryStoresOnlyThroughGivenPointers) {
    double ai = -1, bi = -1, aip = -1, bip = -1;
    TW_Airy(0.0, &ai, &bi, &aip, &bip);
    EXPECT_EQ(ai, 0.35502805388781723926);    // Ai(0)
    EXPECT_EQ(aip, -0.258819403792806798405);  // Ai'(0)
    EXPECT_NEAR(bi, ai * std::sqrt(3.0), 4e-16);
    EXPECT_NEAR(bip, -aip * std::sqrt(3.0), 4e-16);
    bip = -1;
    TW_Airy(1.0, &ai, &bi, nullptr, &bip);
    EXPECT_EQ(bip, -1.0);  // no Ai' pointer: no derivatives at all
    TW_Airy(1.0, nullptr, nullptr, &aip, nullptr);
    TW_Airy(200.0, &ai, &bi, &aip, &bip);
    EXPECT_EQ(ai, 0.0);
    EXPECT_EQ(bi, kInf);
    EXPECT_EQ(aip, 1.7976931348623157e308);
    EXPECT_EQ(bip, 1.7976931348623157e308);
}

TEST(BesselFamily, KelvinAtZeroAndNullResults) {
    double re = -1, im = -1;
    TW_KelvinI(0.0, 0, &re, &im);
    EXPECT_EQ(re, 1.0);
    EXPECT_EQ(im, 0.0);
    TW_KelvinK(0.0, 1, &re, &im);
    EXPECT_TRUE(std::isnan(re) && std::isnan(im));
    TW_KelvinI(2.0, 1, nullptr, nullptr);
    TW_KelvinK(2.0, 1, nullptr, &im);
    TW_BesselJr(1.0, 2.0, nullptr);
    TW_BesselKn(3, 2.0, nullptr);
    EXPECT_TRUE(std::isfinite(im));
}

}  // namespace
