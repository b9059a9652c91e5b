// Bounded fits: frame statuses, empty and short data, non-convergence and the damped step.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/fit.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using twrt::Array2D;
using V = std::vector<double>;
const double kNaNIn = std::numeric_limits<double>::quiet_NaN();
const double kInfIn = std::numeric_limits<double>::infinity();

class FitBounded : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

struct Result {
    int32_t status;
    double q[3];
    double mse;
    int32_t iterations;
    V y;
};

Result Exp(bool power, const V& y, const V& x, const V& lo, const V& up, uint16_t kind = 0,
           const V& guess = {}, int32_t limit = 100) {
    Array1D<double> yh(y);
    Result r{0, {0, 0, 0}, 0, limit, {}};
    const auto f = power ? BoundPowerFit_head : BoundExpFit_head;
    r.status = f(yh.h(), Array1D<double>(x).h(), Array1D<double>().h(), 1e-8, &r.iterations,
                 Array1D<double>(guess).h(), Array1D<double>(lo).h(), Array1D<double>(up).h(), kind, &r.q[0],
                 &r.q[1], &r.q[2], &r.mse);
    r.y = yh.vec();
    return r;
}

TEST_P(FitBounded, ModelStatuses) {
    const V x{0, 0.5, 1, 1.5, 2, 2.5}, y{3, 3.6, 4.4, 5.5, 6.9, 8.8};
    const V lo{-kInfIn, -kInfIn, -kInfIn}, up{kInfIn, kInfIn, kInfIn};
    struct Case {
        bool power;
        V y, x, lo, up;
        uint16_t kind;
        V guess;
        int32_t status;
    };
    const Case cases[] = {
        {false, y, {1, 2}, lo, up, 0, {}, EqSamplesErr},
        {false, y, x, {0, 0}, {1, 1}, 0, {}, SizeMismatchErr},  // shorter than p
        {false, y, x, lo, {1, 1, 1, 1}, 0, {}, SizeMismatchErr},
        {false, y, x, {0, kNaNIn, 0}, up, 0, {}, BoundsNanErr},
        {false, y, x, {0, 2, 0}, {1, 1, 1}, 0, {}, BoundsOrderErr},
        {false, y, x, lo, up, 3, {}, InvalidSelectorErr},
        {true, y, x, lo, up, 0, {}, BadDataRangeErr},  // x = 0 in the power model
        {false, {1}, {1}, lo, up, 0, {}, TooFewDataForModelErr},
        {false, y, x, lo, up, 0, {1, 1}, InitialLengthWarn},  // short guess: ignored
    };
    for (const Case& c : cases) {
        const Result r = Exp(c.power, c.y, c.x, c.lo, c.up, c.kind, c.guess);
        EXPECT_EQ(r.status, c.status);
        if (r.status < 0) {
            EXPECT_TRUE(r.y.empty() && twtest::IsFailureNaN(r.q[0]) && twtest::IsFailureNaN(r.mse));
            EXPECT_EQ(r.iterations, 100);
        }
    }
}

TEST_P(FitBounded, EmptyShortAndStandingOutputs) {
    // No data with every parameter fixed: the bounds are the result.
    Result r = Exp(false, {}, {}, {1, 2, 3}, {1, 2, 3});
    EXPECT_EQ(r.status, 0);
    EXPECT_EQ((V{r.q[0], r.q[1], r.q[2]}), (V{1, 2, 3}));
    EXPECT_EQ(r.mse, 0.0);
    EXPECT_EQ(r.iterations, 0);
    // One sample, two parameters fixed: replicated, the free offset takes the rest. The error
    // shrinks geometrically towards 0 and never meets the relative convergence test, so the
    // limit ends the run: -20062 with the outputs standing.
    r = Exp(false, {5}, {1}, {2, 0.5, -kInfIn}, {2, 0.5, kInfIn});
    EXPECT_EQ(r.status, NoConvergenceErr);
    EXPECT_EQ(r.q[0], 2.0);
    EXPECT_EQ(r.q[1], 0.5);
    EXPECT_NEAR(r.q[2], 5 - 2 * std::exp(0.5), 1e-9);
    ASSERT_EQ(r.y.size(), 1u);
    EXPECT_EQ(r.y[0], 2 * std::exp(0.5) + r.q[2]);
    EXPECT_LT(r.mse, 1e-18);
    EXPECT_EQ(r.iterations, 100);
}

TEST_P(FitBounded, LineShortDataAndLogSigns) {
    // One sample with a free intercept: the line passes through it at the fixed slope.
    Array1D<double> y({4});
    double a = 0, b = 0, mse = 1;
    EXPECT_EQ(
        BoundLinearFit_head(y.h(), Array1D<double>({2}).h(), Array1D<double>().h(),
                            Array1D<double>({1.5, -10}).h(), Array1D<double>({1.5, 10}).h(), &a, &b, &mse),
        0);
    EXPECT_EQ(a, 1.5);
    EXPECT_NEAR(b, 1.0, 1e-12);
    EXPECT_NEAR(mse, 0.0, 1e-20);
    // Two points whose line the slope bound excludes: the least-absolute export takes the bounded
    // least-squares line (slope 1, intercept the mean of y - x) and reports its mae, not 0.
    Array1D<double> ty({1, 3}), tx({0, 1});
    int32_t limit = 5;
    double e = -1;
    EXPECT_EQ(
        BoundLinearFitLAR_head(ty.h(), tx.h(), Array1D<double>().h(), 0, &limit,
                               Array1D<double>({-1, -10}).h(), Array1D<double>({1, 10}).h(), &a, &b, &e),
        0);
    EXPECT_EQ(a, 1.0);
    EXPECT_NEAR(b, 1.5, 1e-9);
    EXPECT_NEAR(e, 0.5, 1e-9);
    EXPECT_NEAR(ty.vec()[1], 2.5, 1e-9);
    // The logarithm needs x of one sign.
    Array1D<double> ly({1, 2, 3});
    double la = 0, lb = 0, le = 0;
    int32_t it = 10;
    EXPECT_EQ(BoundLogFit_head(ly.h(), Array1D<double>({-1, 1, 2}).h(), Array1D<double>().h(), 0, &it,
                               Array1D<double>().h(), Array1D<double>().h(), Array1D<double>().h(), 0, 10.0,
                               &la, &lb, &le),
              NonPositiveDataErr);
    EXPECT_TRUE(ly.vec().empty());
}

TEST_P(FitBounded, DampedStep) {
    struct Case {
        V coef, alpha;
        int32_t k;
        V beta;
        double lambda;
        int32_t status;
        V want;
    };
    const Case cases[] = {
        {{1, 1}, {2, 0, 0, 4}, 2, {2, 4}, 0.0, 0, {2, 2}},  // Gauss-Newton step
        {{1, 1}, {2, 0, 0, 4}, 2, {2, 4}, 1.0, 0, {1.5, 1.5}},
        {{1, 1}, {2, 0, 0, kNaNIn}, 2, {2, 4}, 0.0, NanInfErr, {}},
        {{1, 1}, {1, 1, 1, 1}, 2, {1, 2}, 0.0, SingularMatrixErr, {}},
        {{1, 1}, {1, 0, 0, 1}, 2, {1}, 0.0, EmptyArrayErr, {}},
        {{1, 1, 1}, {1, 0, 0, 1}, 2, {1, 1, 1}, 0.0, EmptyArrayErr, {}},
    };
    for (const Case& c : cases) {
        Array1D<double> coef(c.coef);
        int32_t status = 99;
        double lambda = c.lambda;
        EXPECT_EQ(GetNewCoef_head(coef.h(), Array2D<double>(c.k, c.k, c.alpha).h(),
                                  Array1D<double>(c.beta).h(), &lambda, &status),
                  c.status);
        EXPECT_EQ(status, c.status);
        EXPECT_EQ(coef.vec(), c.want);
    }
}

INSTANTIATE_TEST_SUITE_P(Placements, FitBounded, ::testing::Bool(), twtest::PlacementName);

}  // namespace
