// The constrained solver's own paths: difference gradients and sample-by-sample sums against the
// closed derivatives and batch entries, and the quiet stop once lambda passes 10000.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <vector>

#include "fit/bounded.hpp"

namespace {

using V = std::vector<double>;
const double kInf = std::numeric_limits<double>::infinity();

TEST(FitSolver, DifferenceGradientAgreesWithClosedDerivatives) {
    V x, y;
    for (int i = 0; i < 40; ++i) {
        x.push_back(0.075 * i);
        y.push_back(2 * std::exp(0.5 * x.back()) + 1 + 0.03 * std::sin(7.0 * i));
    }
    const V lower(3, -kInf), upper{kInf, 0.45, kInf};
    for (uint16_t kind : {0, 1, 2}) {
        tw::LmModel closed = tw::BoundedModel(tw::BoundModel::Exp), plain = closed;
        plain.gradient = nullptr;
        plain.batch = nullptr;
        double q1[3] = {1.5, 0.4, 0.5}, q2[3] = {1.5, 0.4, 0.5}, e1 = 0, e2 = 0, l1 = 0.1, l2 = 0.1;
        int32_t it1 = 200, it2 = 200;
        const tw::Status s1 =
            tw::LevenbergMarquardt(x.data(), y.data(), nullptr, 40, kind, closed, q1, upper.data(),
                                   lower.data(), &it1, 1e-10, &l1, nullptr, &e1);
        const tw::Status s2 =
            tw::LevenbergMarquardt(x.data(), y.data(), nullptr, 40, kind, plain, q2, upper.data(),
                                   lower.data(), &it2, 1e-10, &l2, nullptr, &e2);
        EXPECT_TRUE(s1 == 0 || s1 == NoConvergenceErr) << s1;
        EXPECT_TRUE(s2 == 0 || s2 == NoConvergenceErr) << s2;
        EXPECT_EQ(q1[1], 0.45);  // held at the bound
        EXPECT_EQ(q2[1], 0.45);
        EXPECT_NEAR(e1, e2, 1e-6 * e1) << kind;
        for (int j = 0; j < 3; ++j) EXPECT_NEAR(q1[j], q2[j], 1e-4 * (1 + std::fabs(q1[j]))) << kind;
    }
}

// Defined only at its start: every trial is NaN, so lambda grows until the solver gives up.
double OnlyAtOne(double x, const double* q, const void*) { return q[0] == 1.0 ? x : std::nan(""); }
void Slope(double x, const double*, const void*, double* g) { g[0] = x; }

TEST(FitSolver, LambdaAbove10000EndsQuietly) {
    const V x{1, 2, 3, 4}, y{2, 4, 6, 8}, lower{-kInf}, upper{kInf};
    const tw::LmModel m{1, OnlyAtOne, Slope, nullptr, nullptr};
    double q = 1.0, lambda = 1.0, e = 0;
    int32_t it = 100;
    EXPECT_EQ(tw::LevenbergMarquardt(x.data(), y.data(), nullptr, 4, 0, m, &q, upper.data(), lower.data(),
                                     &it, 0, &lambda, nullptr, &e),
              0);
    EXPECT_EQ(q, 1.0);
    EXPECT_EQ(lambda, 100000.0);
    EXPECT_EQ(it, 4);
    EXPECT_EQ(e, 7.5);  // (1 + 4 + 9 + 16) / 4
}

}  // namespace
