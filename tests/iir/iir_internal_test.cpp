// The elliptic helpers on identities of the Jacobi functions. Designs and filters are compared
// with SciPy in tests/reference/test_iir.py.
#include <gtest/gtest.h>

#include <cmath>
#include <numbers>

#include "filter/iir_design.hpp"

namespace {

constexpr double kPi = std::numbers::pi;

TEST(EllipticHelpers, CompleteIntegralAtKnownModuli) {
    // c = 1 is modulus 0; c = 1/sqrt(2) the lemniscatic case Gamma(1/4)^2 / (4 sqrt(pi)).
    EXPECT_NEAR(tw::EllipticKOfComplement(1.0), kPi / 2, 4e-16);
    const double lemniscatic = std::pow(std::tgamma(0.25), 2) / (4 * std::sqrt(kPi));
    EXPECT_NEAR(tw::EllipticKOfComplement(std::sqrt(0.5)), lemniscatic, 1e-15);
}

TEST(EllipticHelpers, JacobiFunctionsSatisfyTheirIdentities) {
    double sn, cn, dn;
    for (double u : {0.1, 0.7, 1.3, 2.9}) {  // modulus 0: sin, cos, 1
        tw::JacobiSnCnDn(u, 1.0, &sn, &cn, &dn);
        EXPECT_NEAR(sn, std::fabs(std::sin(u)), 1e-15) << u;
        EXPECT_NEAR(dn, 1.0, 1e-15);
    }
    for (double c : {0.05, 0.3, 0.8, 0.999}) {
        const double m = 1 - c * c, K = tw::EllipticKOfComplement(c);
        tw::JacobiSnCnDn(K, c, &sn, &cn, &dn);  // sn(K) = 1, dn(K) = c
        EXPECT_NEAR(sn, 1.0, 1e-14) << c;
        EXPECT_NEAR(dn, c, 1e-14) << c;
        tw::JacobiSnCnDn(K / 2, c, &sn, &cn, &dn);  // sn(K/2) = 1/sqrt(1 + c)
        EXPECT_NEAR(sn, 1 / std::sqrt(1 + c), 1e-14) << c;
        for (double u : {0.05 * K, 0.4 * K, 0.9 * K}) {
            tw::JacobiSnCnDn(u, c, &sn, &cn, &dn);
            EXPECT_NEAR(sn * sn + cn * cn, 1.0, 1e-14);
            EXPECT_NEAR(dn * dn + m * sn * sn, 1.0, 1e-14);
            // The inverse of sc stops at a single-precision tolerance.
            EXPECT_NEAR(tw::InverseSc(sn / cn, c), u, 2e-7 * u) << c << " " << u;
        }
    }
}

}  // namespace
