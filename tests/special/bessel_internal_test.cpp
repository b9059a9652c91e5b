// Kummer's function against closed forms through each of its routes, its rules for zero, equal
// and infinite parameters; and the integer-order J recurrences the exports do not reach.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "special/bessel.hpp"

namespace {

constexpr double kInf = std::numeric_limits<double>::infinity();
const double kNaN = std::numeric_limits<double>::quiet_NaN();

struct Closed {
    double a, b, x, expected, tolerance;  // relative
};

TEST(Hyp1F1, ClosedForms) {
    const double sqrtPi = std::sqrt(M_PI);
    const Closed cases[] = {
        {1.0, 2.0, 0.7, std::expm1(0.7) / 0.7, 4e-16},      // (e^x - 1) / x
        {1.0, 2.0, 30.0, std::expm1(30.0) / 30.0, 4e-15},   // long positive series
        {1.0, 2.0, -50.0, -std::expm1(-50.0) / 50.0, 1e-14},  // Kummer's route or the expansion
        {1.0, 2.0, 400.0, std::expm1(400.0) / 400.0, 1e-13},
        {-2.0, 1.0, 3.0, 1.0 - 6.0 + 4.5, 1e-15},           // Laguerre L_2
        {-3.0, 0.5, 2.0, 1.0 - 12.0 + 16.0 - 64.0 / 15.0, 1e-14},  // terminating sum
        {0.5, 1.5, -4.0, sqrtPi / 4.0 * std::erf(2.0), 1e-14},  // erf(x) sqrt(pi) / 2x at -x^2
        {0.5, 1.5, -100.0, sqrtPi / 20.0 * std::erf(10.0), 1e-13},
        {0.5, 1.5, -1000.0, sqrtPi / (2.0 * std::sqrt(1000.0)), 1e-13},  // both series fail: asymptotic
        {2.0, 2.0, -3.0, std::exp(-3.0), 0.0},               // b = a
    };
    for (const Closed& c : cases) {
        const double got = tw::Hyp1F1(c.a, c.b, c.x);
        EXPECT_NEAR(got, c.expected, c.tolerance * std::fabs(c.expected) + 1e-300)
            << "M(" << c.a << ", " << c.b << ", " << c.x << ")";
    }
}

TEST(Hyp1F1, ParameterRules) {
    EXPECT_EQ(tw::Hyp1F1(0.0, 3.0, 5.0), 1.0);
    EXPECT_EQ(tw::Hyp1F1(2.5, 3.0, 0.0), 1.0);
    EXPECT_EQ(tw::Hyp1F1(kInf, kInf, 1.5), std::exp(1.5));
    EXPECT_EQ(tw::Hyp1F1(2.0, kInf, 7.0), 1.0);
    EXPECT_EQ(tw::Hyp1F1(kInf, 2.0, -1.0), kInf);
    EXPECT_TRUE(std::isnan(tw::Hyp1F1(kInf, -kInf, 1.0)));
    EXPECT_TRUE(std::isnan(tw::Hyp1F1(kInf, 2.0, 0.0)));
    EXPECT_TRUE(std::isnan(tw::Hyp1F1(1.0, 2.0, kNaN)));
    EXPECT_TRUE(std::isnan(tw::Hyp1F1(kNaN, 2.0, 1.0)));
    EXPECT_EQ(tw::Hyp1F1(1.0, -2.0, 1.0), kInf);  // b a non-positive integer: a pole
    EXPECT_EQ(tw::Hyp1F1(1.0, 2.0, 800.0), kInf);  // overflow is the value, not a failure
}

}  // namespace

namespace {

// BesselJn is reached from the exports only at orders 0 and 1; its recurrences are checked here.
// Expected values: scipy.special.jv.
TEST(BesselJn, MillerAndUpwardRecurrences) {
    struct {
        int n;
        double x, expected;
    } const cases[] = {
        {2, 1.5, 0.23208767214421475},    {5, 0.3, 6.304432633771069e-07},    // Miller, n > |x|
        {20, 10.0, 1.1513369247813376e-05}, {100, 1.0, 8.431828789626748e-189},
        {60, 59.0, 0.08817412164270735},  {3, 7.0, -0.16755558799533432},    // upward, n <= |x|
        {12, 40.0, -0.1269779961178481},  {-3, 2.5, -0.21660039103911358},   // signs
        {4, -3.0, 0.13203418392461216},   {-5, -8.0, 0.18577477219056332},
    };
    // Each recurrence step rounds: a few eps per order.
    for (const auto& c : cases)
        EXPECT_NEAR(tw::BesselJn(c.n, c.x), c.expected, 8 * 2.2e-16 * (std::abs(c.n) + 1) * std::fabs(c.expected))
            << c.n << " " << c.x;
    EXPECT_EQ(tw::BesselJn(3, 0.0), 0.0);
    EXPECT_EQ(tw::BesselJn(3, kInf), 0.0);
    EXPECT_TRUE(std::isnan(tw::BesselJn(3, -kInf)));
}

}  // namespace
