// The multiple-root core as filter design calls it: denominators of fourth-order sections split
// into their two conjugate pairs, listed side by side.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <vector>

#include "numeric/poly.hpp"

namespace {

using tw::cdouble;

// 1 - 2 rho cos(theta) x + rho^2 x^2, whose roots are exp(+-i theta) / rho.
std::vector<double> Factor(double rho, double theta) { return {1, -2 * rho * std::cos(theta), rho * rho}; }

TEST(PolyCores, QuarticSectionsSplitIntoPairs) {
    struct Case {
        double rho1, theta1, rho2, theta2;
        int32_t distinct;
    };
    const Case cases[] = {{0.9, 0.3, 0.95, 0.35, 4}, {0.5, 2.0, 0.99, 0.01, 4}, {0.8, 1.1, 0.8, 1.1, 2}};
    for (const Case& k : cases) {
        std::vector<double> c(5);
        tw::PolyMultiply(Factor(k.rho1, k.theta1).data(), 3, Factor(k.rho2, k.theta2).data(), 3, c.data());
        cdouble roots[5];
        int32_t mult[5], count = 0;
        double residual = 0;
        ASSERT_EQ(tw::MultPolyRoots<double>(c.data(), 5, 0, -1, roots, mult, &count, &residual), 0);
        ASSERT_EQ(count, k.distinct);
        EXPECT_LT(residual, 1e-12);
        const cdouble want[2] = {std::polar(1 / k.rho1, k.theta1), std::polar(1 / k.rho2, k.theta2)};
        for (int32_t i = 0; i < count; i += 2) {
            EXPECT_GT(roots[i].imag(), 0);
            EXPECT_EQ(roots[i + 1], std::conj(roots[i]));
            EXPECT_EQ(mult[i], 4 / count);
            const double err = std::min(std::abs(roots[i] - want[0]), std::abs(roots[i] - want[1]));
            EXPECT_LT(err, 1e-9) << k.rho1 << " " << k.theta2;
        }
        if (count == 4) {
            EXPECT_GT(std::abs(roots[0] - roots[2]), 1e-3);
        }
    }
}

}  // namespace
