// The stated edges of the elliptic, hypergeometric and other special functions, a few values known
// in closed form, and the result pointers. The reference suite compares the paths with SciPy.
#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "twanlys/special.h"
#include "twrt.h"

namespace {

constexpr double kInf = std::numeric_limits<double>::infinity();
const double kNaN = std::numeric_limits<double>::quiet_NaN();
const double kPi = std::acos(-1.0);

template <class F, class... A>
double Call(F f, A... args) {
    double out = -12345.0;
    f(args..., &out);
    return out;
}

struct Case {
    std::string what;
    std::function<double()> call;
    double expected;   // NaN: any NaN
    double tolerance;  // relative; 0: bit for bit, with the sign of zero
};

TEST(OtherFamily, EdgesAndClosedForms) {
    const std::vector<Case> cases = {
        {"K(1) selected by NaN", [] { return Call(TW_Elliptic1, 1.0, kNaN); }, kInf, 0},
        {"K(1) by selector",
         [] {
             double o;
             TW_Elliptic1_85(1.0, 0.3, &o, 1);
             return o;
         },
         kInf, 0},
        {"F(1 | 1) = atanh(sin 1)", [] { return Call(TW_Elliptic1, 1.0, 1.0); }, std::atanh(std::sin(1.0)),
         4e-16},
        {"zeta(1)", [] { return Call(TW_Zeta, 1.0); }, kInf, 0},
        {"zeta(200)", [] { return Call(TW_Zeta, 200.0); }, 1.0, 0},
        {"zeta(-1) = -1/12", [] { return Call(TW_Zeta, -1.0); }, -1.0 / 12, 8e-16},
        {"E_1(0)", [] { return Call(TW_ExpI, 0.0, 1); }, kInf, 0},
        {"E_3(0)", [] { return Call(TW_ExpI, 0.0, 3); }, 0.5, 0},
        {"Ci(0)", [] { return Call(TW_CosI, 0.0); }, -kInf, 0},
        {"Shi(1000)", [] { return Call(TW_SinhI, 1000.0); }, kInf, 0},
        {"Chi(-1) is Chi(1)", [] { return Call(TW_CoshI, -1.0); }, Call(TW_CoshI, 1.0), 0},
        {"Diln(+Inf)", [] { return Call(TW_Diln, kInf); }, -kInf, 0},
        // The rational form of the dilogarithm is good to some 8 ulp.
        {"Diln(2) = -pi^2/12", [] { return Call(TW_Diln, 2.0); }, -kPi * kPi / 12, 2e-15},
        {"Kummer(5, 0, 1)", [] { return Call(TW_Kummer, 5.0, 0.0, 1.0); }, 1.0, 0},
        {"Tricomi(0, 1, 1)", [] { return Call(TW_Tricomi, 0.0, 1.0, 1.0); }, kInf, 0},
        // 2F1(1, 1; 2; x) = -ln(1 - x)/x; the 2011 generation reaches it through Pfaff.
        {"Gauss(0.1, 1, 1, 2)", [] { return Call(TW_Gauss, 0.1, 1.0, 1.0, 2.0); }, -std::log1p(-0.1) / 0.1,
         4e-16},
        {"Gauss_2011(0.1, 1, 1, 2)", [] { return Call(TW_Gauss_2011, 0.1, 1.0, 1.0, 2.0); },
         -std::log1p(-0.1) / 0.1, 4e-16},
        {"Gauss, c a pole", [] { return Call(TW_Gauss, 0.5, 1.0, 1.0, -3.0); }, kInf, 0},
        {"Struve(0, -2)", [] { return Call(TW_Struve, 0.0, -2.0); }, kNaN, 0},
        {"D_0.5(-Inf): sign of 1/Gamma(-0.5)", [] { return Call(TW_ParabolicCylinder, -kInf, 0.5); }, -kInf,
         0},
        {"D_3(-Inf)", [] { return Call(TW_ParabolicCylinder, -kInf, 3.0); }, -0.0, 0},
        {"D_-1(x) = e^(x^2/4) sqrt(pi/2) erfc(x/sqrt 2)",
         [] { return Call(TW_ParabolicCylinder, 1.5, -1.0); },
         std::exp(0.5625) * std::sqrt(kPi / 2) * std::erfc(1.5 / std::sqrt(2.0)), 1e-14},
    };
    for (const Case& c : cases) {
        const double got = c.call();
        if (std::isnan(c.expected)) {
            EXPECT_TRUE(std::isnan(got)) << c.what << " gave " << got;
        } else if (c.tolerance == 0.0) {
            EXPECT_EQ(got, c.expected) << c.what;
            EXPECT_EQ(std::signbit(got), std::signbit(c.expected)) << c.what;
        } else {
            EXPECT_NEAR(got, c.expected, c.tolerance * std::fabs(c.expected)) << c.what;
        }
    }
}

TEST(OtherFamily, PairsAndNullPointers) {
    double s = 0, c = 0, sn = 0, cn = 0, dn = 0, ph = 0;
    TW_FresnelIntegrals(-kInf, &s, &c);
    EXPECT_EQ(s, -0.5);
    EXPECT_EQ(c, -0.5);
    TW_EllipticJ(0.7, 0.0, &sn, &cn, &dn, nullptr);  // the amplitude pointer may be null
    EXPECT_NEAR(sn, std::sin(0.7), 1e-16);
    EXPECT_NEAR(cn, std::cos(0.7), 1e-16);
    EXPECT_EQ(dn, 1.0);
    TW_EllipticJ(kNaN, 0.5, &sn, &cn, &dn, &ph);
    EXPECT_TRUE(std::isnan(sn) && std::isnan(cn) && std::isnan(dn) && std::isnan(ph));
}

}  // namespace
