// Where the gamma family departs from the published routines: screens, poles, selectors and
// factorial boundaries. Values from SciPy or math.factorial are marked; the rest follow from the
// definitions.
#include <gtest/gtest.h>

#include <bit>
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
const double kQNaN = std::numeric_limits<double>::quiet_NaN();
const double kNegNaN = std::bit_cast<double>(uint64_t{0xFFF8000000000001});
const double kSNaN = std::bit_cast<double>(uint64_t{0x7FF0000000000001});

template <class F, class... A>
double Call(F f, A... args) {
    double out = -12345.0;
    f(args..., &out);
    return out;
}
template <class F, class... A>
double Sel(F f, int32_t selector, A... args) {
    double out = -12345.0;
    f(args..., &out, selector);
    return out;
}

struct Case {
    std::string what;
    std::function<double()> call;
    double expected;  // NaN: any NaN
    int ulp = 0;
};

double UlpDistance(double a, double b) {
    if (a == b) return 0;
    return std::fabs(a - b) / (std::nextafter(std::fabs(b), kInf) - std::fabs(b));
}

void Check(const std::vector<Case>& cases) {
    for (const Case& c : cases) {
        const double got = c.call();
        if (std::isnan(c.expected))
            EXPECT_TRUE(std::isnan(got)) << c.what << " gave " << got;
        else if (c.ulp == 0)
            EXPECT_EQ(got, c.expected) << c.what;
        else
            EXPECT_LE(UlpDistance(got, c.expected), c.ulp) << c.what << " gave " << got;
    }
}

TEST(GammaFamily, ScreenOfNaNAndInfinities) {
    const double n = kQNaN;
    Check({
        {"Gamma(NaN)", [&] { return Call(TW_Gamma, n, n); }, n},
        {"Gamma(+inf)", [] { return Call(TW_Gamma, kInf, kQNaN); }, kInf},
        {"Gamma(-inf)", [] { return Call(TW_Gamma, -kInf, kQNaN); }, kQNaN},
        {"LnGamma(NaN)", [] { return Call(TW_LnGamma, kSNaN); }, kQNaN},
        {"LnGamma(+inf)", [] { return Call(TW_LnGamma, kInf); }, kInf},
        {"LnGamma(-inf)", [] { return Call(TW_LnGamma, -kInf); }, kQNaN},
        {"Stirling(+inf)", [] { return Call(TW_Stirling, kInf); }, kInf},
        {"Stirling(-inf)", [] { return Call(TW_Stirling, -kInf); }, kQNaN},
        {"Psi(+inf)", [] { return Call(TW_Psi, kInf); }, kInf},
        {"Psi(-inf)", [] { return Call(TW_Psi, -kInf); }, kQNaN},
        {"Psi(NaN)", [] { return Call(TW_Psi, kNegNaN); }, kQNaN},
        {"Erf(+inf)", [] { return Call(TW_Erf, kInf); }, 1.0},
        {"Erf(-inf)", [] { return Call(TW_Erf, -kInf); }, -1.0},
        {"Erf(NaN)", [] { return Call(TW_Erf, kQNaN); }, kQNaN},
        {"ErfC(+inf)", [] { return Call(TW_ErfC, kInf); }, 0.0},
        {"ErfC(-inf)", [] { return Call(TW_ErfC, -kInf); }, 2.0},
        {"ErfC(NaN)", [] { return Call(TW_ErfC, kSNaN); }, kQNaN},
        {"Beta(NaN, 1)", [] { return Call(TW_Beta, kQNaN, 1.0, kQNaN); }, kQNaN},
        {"Beta(inf, 1)", [] { return Call(TW_Beta, kInf, 1.0, kQNaN); }, kQNaN},
        {"Beta(2, -inf)", [] { return Call(TW_Beta, 2.0, -kInf, kQNaN); }, kQNaN},
        {"Beta(2, 3, inf)", [] { return Call(TW_Beta, 2.0, 3.0, kInf); }, kQNaN},
        {"Beta(NaN, 3, 0.5)", [] { return Call(TW_Beta, kQNaN, 3.0, 0.5); }, kQNaN},
    });
}

TEST(GammaFamily, IncompleteGammaScreensInItsOwnOrder) {
    Check({
        {"P(a, +inf) is 1 even for a NaN", [] { return Call(TW_Gamma, kQNaN, kInf); }, 1.0},
        {"Q(a, +inf) is 0 even for a NaN", [] { return Call(TW_GammaC, kQNaN, kInf); }, 0.0},
        {"P(2, NaN) through _85", [] { return Sel(TW_Gamma_85, 0, 2.0, kQNaN); }, kQNaN},
        {"P(-inf, 1)", [] { return Call(TW_Gamma, -kInf, 1.0); }, kQNaN},
        {"Q(-inf, 1)", [] { return Call(TW_GammaC, -kInf, 1.0); }, kQNaN},
        {"P(+inf, 1) is +inf", [] { return Call(TW_Gamma, kInf, 1.0); }, kInf},
        {"P(+inf, 0)", [] { return Call(TW_Gamma, kInf, 0.0); }, 0.0},
        {"Q(+inf, 1) is +inf", [] { return Call(TW_GammaC, kInf, 1.0); }, kInf},
        {"Q(+inf, -1) is +inf before the sign test", [] { return Call(TW_GammaC, kInf, -1.0); }, kInf},
        {"P(0, 1)", [] { return Call(TW_Gamma, 0.0, 1.0); }, kQNaN},
        {"Q(-1, 1)", [] { return Call(TW_GammaC, -1.0, 1.0); }, kQNaN},
        {"P(1, -1)", [] { return Call(TW_Gamma, 1.0, -1.0); }, kQNaN},
        {"Q(2, 0)", [] { return Call(TW_GammaC, 2.0, 0.0); }, 1.0},
        {"P(2, 0) through _85", [] { return Sel(TW_Gamma_85, 0, 2.0, 0.0); }, 0.0},
        // scipy.special.gammaincc(3, 0.5): the 1 - P side
        {"Q(3, 0.5)", [] { return Call(TW_GammaC, 3.0, 0.5); }, 0.9856123220330293, 4},
    });
}

TEST(GammaFamily, PolesAreNaNAndSelectorsChooseTheForm) {
    Check({
        {"Gamma(5) by NaN x", [] { return Call(TW_Gamma, 5.0, kQNaN); }, 24.0},
        {"Gamma(5) by a negative NaN x", [] { return Call(TW_Gamma, 5.0, kNegNaN); }, 24.0},
        {"Gamma(5) by a signalling NaN x", [] { return Call(TW_Gamma, 5.0, kSNaN); }, 24.0},
        {"_85 selector 0 with NaN x", [] { return Sel(TW_Gamma_85, 0, 5.0, kQNaN); }, kQNaN},
        {"_85 selector 1 ignores x", [] { return Sel(TW_Gamma_85, 1, 5.0, 2.0); }, 24.0},
        // scipy.special.gammainc(5, 2)
        {"_85 selector 2 is incomplete", [] { return Sel(TW_Gamma_85, 2, 5.0, 2.0); }, 0.052653017343711125,
         4},
        {"Gamma(0)", [] { return Sel(TW_Gamma_85, 1, 0.0, 1.0); }, kQNaN},
        {"Gamma(-0)", [] { return Call(TW_Gamma, -0.0, kQNaN); }, kQNaN},
        {"Gamma(-1)", [] { return Call(TW_Gamma, -1.0, kQNaN); }, kQNaN},
        {"Gamma(-33)", [] { return Call(TW_Gamma, -33.0, kQNaN); }, kQNaN},
        {"Gamma(-34)", [] { return Call(TW_Gamma, -34.0, kQNaN); }, kQNaN},
        {"Gamma(-1e300)", [] { return Call(TW_Gamma, -1e300, kQNaN); }, kQNaN},
        // scipy.special.gamma(-33.5): the reflection branch
        {"Gamma(-33.5)", [] { return Sel(TW_Gamma_85, 1, -33.5, 0.0); }, 6.227609042535816e-38, 4},
        // scipy.special.gamma(1e-10): the small-argument end case
        {"Gamma(1e-10)", [] { return Call(TW_Gamma, 1e-10, kQNaN); }, 9999999999.422785, 1},
        {"Gamma(171.7) overflows", [] { return Call(TW_Gamma, 171.7, kQNaN); }, kInf},
        {"LnGamma(-1.5): no reflection", [] { return Call(TW_LnGamma, -1.5); }, kQNaN},
        {"LnGamma(-1e-300)", [] { return Call(TW_LnGamma, -1e-300); }, kQNaN},
        {"LnGamma(0)", [] { return Call(TW_LnGamma, 0.0); }, kInf},
        {"LnGamma(-0)", [] { return Call(TW_LnGamma, -0.0); }, kInf},
        {"LnGamma(1)", [] { return Call(TW_LnGamma, 1.0); }, 0.0},
        {"LnGamma(2)", [] { return Call(TW_LnGamma, 2.0); }, 0.0},
        {"Stirling(0)", [] { return Call(TW_Stirling, 0.0); }, kInf},
        {"Stirling(-1)", [] { return Call(TW_Stirling, -1.0); }, kQNaN},
        {"Stirling at the exp limit", [] { return Call(TW_Stirling, 709.782712893384); }, kInf},
        {"Stirling(1e-300): correction overflows", [] { return Call(TW_Stirling, 1e-300); }, kInf},
        {"Psi(0)", [] { return Call(TW_Psi, 0.0); }, kInf},
        {"Psi(-0)", [] { return Call(TW_Psi, -0.0); }, kInf},
        {"Psi(-3)", [] { return Call(TW_Psi, -3.0); }, kInf},
        {"Psi(-1e300)", [] { return Call(TW_Psi, -1e300); }, kInf},
        {"Psi(1) = -Euler", [] { return Call(TW_Psi, 1.0); }, -0.5772156649015329},
        {"Psi(2) = 1 - Euler", [] { return Call(TW_Psi, 2.0); }, 1.0 - 0.5772156649015329},
    });
}

TEST(GammaFamily, BetaSelectorsAndDomain) {
    Check({
        {"I_0.3(1, 1)", [] { return Sel(TW_Beta_85, 0, 1.0, 1.0, 0.3); }, 0.3},
        {"B(1, 1) by selector", [] { return Sel(TW_Beta_85, 1, 1.0, 1.0, 0.3); }, 1.0},
        {"B(1, 1) by NaN x", [] { return Call(TW_Beta, 1.0, 1.0, kQNaN); }, 1.0},
        {"_85 with NaN x is incomplete", [] { return Sel(TW_Beta_85, 0, 1.0, 1.0, kQNaN); }, kQNaN},
        {"I_x beyond 1", [] { return Call(TW_Beta, 2.0, 3.0, 1.5); }, kQNaN},
        {"I_x below 0", [] { return Call(TW_Beta, 2.0, 3.0, -0.1); }, kQNaN},
        {"negative a", [] { return Call(TW_Beta, -1.0, 3.0, 0.5); }, kQNaN},
        {"negative b", [] { return Call(TW_Beta, 1.0, -3.0, 0.5); }, kQNaN},
        {"I_0", [] { return Call(TW_Beta, 2.0, 3.0, 0.0); }, 0.0},
        {"I_1", [] { return Call(TW_Beta, 2.0, 3.0, 1.0); }, 1.0},
        // I_x(1, b) = 1 - (1 - x)^b, and -b ln(1 - x) once b is tiny
        {"I_0.5(1, 2)", [] { return Call(TW_Beta, 1.0, 2.0, 0.5); }, 0.75},
        {"I_0.5(1, 1e-14)", [] { return Call(TW_Beta, 1.0, 1e-14, 0.5); }, -1e-14 * std::log(0.5)},
        // B(a, b) with a pole in Gamma(b)
        {"B(2, -1)", [] { return Call(TW_Beta, 2.0, -1.0, kQNaN); }, kQNaN},
    });
}

TEST(GammaFamily, FactorialBoundaries) {
    const double f33 = 8.683317618811886e+36;
    Check({
        {"Fact(-1)", [] { return Call(TW_Fact, -1); }, kQNaN},
        {"Fact(0)", [] { return Call(TW_Fact, 0); }, 1.0},
        {"Fact(33) from the table", [] { return Call(TW_Fact, 33); }, f33},
        {"Fact(34) = 34 * 33!", [&] { return Call(TW_Fact, 34); }, 34.0 * f33},
        // float(math.factorial(n))
        {"Fact(50), extended product", [] { return Call(TW_Fact, 50); }, 3.0414093201713376e+64, 1},
        {"Fact(51), gamma", [] { return Call(TW_Fact, 51); }, 1.5511187532873822e+66, 4},
        {"Fact(170)", [] { return Call(TW_Fact, 170); }, 7.257415615307999e+306, 4},
        {"Fact(171)", [] { return Call(TW_Fact, 171); }, kInf},
        {"LnFact(-1)", [] { return Call(TW_LnFact, -1); }, kQNaN},
        {"LnFact(0) by the general path", [] { return Call(TW_LnFact, 0); }, 0.0},
        {"LnFact(1)", [] { return Call(TW_LnFact, 1); }, 0.0},
    });
}

TEST(GammaFamily, ErrorFunctionEnds) {
    Check({
        {"ErfC(-30)", [] { return Call(TW_ErfC, -30.0); }, 2.0},
        {"ErfC(27) underflows to 0", [] { return Call(TW_ErfC, 27.0); }, 0.0},
        // scipy.special.erf(1): the polynomial branch
        {"Erf(1)", [] { return Call(TW_Erf, 1.0); }, 0.8427007929497148, 1},
        {"Erf(-1) is odd", [] { return -Call(TW_Erf, -1.0); }, 0.8427007929497148, 1},
    });
}

TEST(GammaFamily, ScalarEntriesNeverReachTheHost) {
    const int64_t allocs = TWRTAllocCount(), resizes = TWRTResizeCount();
    double sum = 0;
    for (int32_t n = -2; n < 200; ++n) {
        sum += Call(TW_Fact, n) + Call(TW_LnFact, n) + Call(TW_Gamma, 0.37 * n, kQNaN);
        sum += Call(TW_Gamma, 0.5 * n, 0.25 * n) + Call(TW_GammaC, 0.5 * n, 0.25 * n);
        sum += Call(TW_Beta, 0.1 * n, 3.0, 0.004 * n) + Call(TW_Psi, -0.3 * n) + Call(TW_ErfC, 0.1 * n);
    }
    EXPECT_TRUE(std::isnan(sum));
    EXPECT_EQ(TWRTAllocCount(), allocs);
    EXPECT_EQ(TWRTResizeCount(), resizes);
}

TEST(GammaFamily, NullResultPointerIsIgnored) {
    TW_Gamma(5.0, kQNaN, nullptr);
    TW_Gamma_85(5.0, 1.0, nullptr, 0);
    TW_GammaC(5.0, 1.0, nullptr);
    TW_LnGamma(5.0, nullptr);
    TW_Stirling(5.0, nullptr);
    TW_Fact(5, nullptr);
    TW_LnFact(5, nullptr);
    TW_Psi(5.0, nullptr);
    TW_Beta(1.0, 2.0, 0.5, nullptr);
    TW_Beta_85(1.0, 2.0, 0.5, nullptr, 1);
    TW_Erf(0.5, nullptr);
    TW_ErfC(0.5, nullptr);
    SUCCEED();
}

}  // namespace
