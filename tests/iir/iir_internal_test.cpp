// The elliptic helpers on identities of the Jacobi functions, and the filter cores on packed
// memory. Designs and filters are compared with SciPy in tests/reference/test_iir.py.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <cstring>
#include <numbers>
#include <vector>

#include "filter/iir_design.hpp"
#include "filter/iir_filter.hpp"

namespace {

constexpr double kPi = std::numbers::pi;

TEST(EllipticHelpers, CompleteIntegralAtKnownModuli) {
    // c = 1 is modulus 0; c = 1/sqrt(2) the lemniscatic case Gamma(1/4)^2 / (4 sqrt(pi)).
    EXPECT_NEAR(tw::EllipticK(1.0), kPi / 2, 4e-16);
    const double lemniscatic = std::pow(std::tgamma(0.25), 2) / (4 * std::sqrt(kPi));
    EXPECT_NEAR(tw::EllipticK(std::sqrt(0.5)), lemniscatic, 1e-15);
}

TEST(EllipticHelpers, JacobiFunctionsSatisfyTheirIdentities) {
    double sn, cn, dn;
    for (double u : {0.1, 0.7, 1.3, 2.9}) {  // modulus 0: sin, cos, 1
        tw::JacobiSnCnDn(u, 1.0, &sn, &cn, &dn);
        EXPECT_NEAR(sn, std::fabs(std::sin(u)), 1e-15) << u;
        EXPECT_NEAR(dn, 1.0, 1e-15);
    }
    for (double c : {0.05, 0.3, 0.8, 0.999}) {
        const double m = 1 - c * c, K = tw::EllipticK(c);
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

TEST(FilterCores, PackedMemoryGivesTheAlignedResult) {
    // The same filter on data at 8-byte and at 4-mod-8 addresses, bit for bit.
    const double a[4] = {1.5, -0.4, 0.3, 0.1}, b[3] = {0.2, 0.7, -0.5};
    std::vector<double> x(64);
    for (size_t i = 0; i < x.size(); ++i)
        x[i] = std::sin(0.37 * static_cast<double>(i)) + 1e-3 * static_cast<double>(i);
    std::vector<double> aligned = x, xs(2, 0.25), ys(3, -0.5);
    ASSERT_EQ(tw::IirDirectFilter(tw::Cells<double>(aligned.data()), tw::Cells<double>(aligned.data()), 64,
                                  tw::Cells<double>(a), 4, tw::Cells<double>(b), 3,
                                  tw::Cells<double>(xs.data()), tw::Cells<double>(ys.data())),
              0);
    std::vector<unsigned char> raw(8 * 80 + 4);
    unsigned char* p = raw.data() + 4;  // 4 mod 8 when the vector is 8-aligned
    std::memcpy(p, x.data(), 8 * 64);
    const double xs0[2] = {0.25, 0.25}, ys0[3] = {-0.5, -0.5, -0.5};
    std::memcpy(p + 8 * 64, xs0, sizeof xs0);
    std::memcpy(p + 8 * 66, ys0, sizeof ys0);
    ASSERT_EQ(tw::IirDirectFilter(tw::Cells<double>(p), tw::Cells<double>(p), 64, tw::Cells<double>(a), 4,
                                  tw::Cells<double>(b), 3, tw::Cells<double>(p + 8 * 64),
                                  tw::Cells<double>(p + 8 * 66)),
              0);
    std::vector<double> packed(69);
    std::memcpy(packed.data(), p, 8 * 69);
    for (int i = 0; i < 64; ++i) EXPECT_EQ(packed[i], aligned[i]) << i;
    for (int i = 0; i < 2; ++i) EXPECT_EQ(packed[64 + i], xs[i]);
    for (int i = 0; i < 3; ++i) EXPECT_EQ(packed[66 + i], ys[i]);
}

}  // namespace
