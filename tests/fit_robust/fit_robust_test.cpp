// Robust fits: statuses, loop limits and the coefficients-only contract, with values derived by
// hand (the numerics against NumPy/SciPy live in tests/reference/test_fit_robust.py).
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

class FitRobust : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

struct Line {
    int32_t status;
    double slope, intercept, err;
    int32_t iterations;
    V y;
};

Line RunLine(bool lar, const V& y, const V& x, const V& w, int32_t limit, int32_t coefOnly = 0) {
    Array1D<double> yh(y);
    Line r{0, 0, 0, -7, limit, {}};
    r.status = lar ? LARLinearFit_head(yh.h(), Array1D<double>(x).h(), Array1D<double>(w).h(), 1e-6, &r.slope,
                                       &r.intercept, &r.err, &r.iterations, -1.0, coefOnly)
                   : BiLinearFit_head(yh.h(), Array1D<double>(x).h(), Array1D<double>(w).h(), 1e-6, &r.slope,
                                      &r.intercept, &r.err, &r.iterations, coefOnly);
    r.y = yh.vec();
    return r;
}

TEST_P(FitRobust, LineStatuses) {
    struct Case {
        bool lar;
        V y, x, w;
        int32_t status;
    };
    const Case cases[] = {
        {false, {1}, {1}, {}, TooFewSamples2Err},
        {true, {1, 2, 3}, {1, 2}, {}, EqSamplesErr},
        {false, {1, 2, 3}, {1, 2, 3}, {0, 5, 0}, DegenerateDataErr},
        {true, {1, 2, 3, 4}, {0, 1, 0, 2}, {}, MultipleRepeatedErr},  // two x at 0
        {true, {1, 2, 3}, {1, 2, 3}, {1, kNaNIn, 1}, NanInfErr},
    };
    for (const Case& c : cases) {
        for (int32_t coefOnly : {0, 1}) {
            const Line r = RunLine(c.lar, c.y, c.x, c.w, 10, coefOnly);
            EXPECT_EQ(r.status, c.status);
            EXPECT_TRUE(twtest::IsFailureNaN(r.slope) && twtest::IsFailureNaN(r.intercept));
            // Coefficients only: y stays, and the error output is not touched.
            EXPECT_EQ(r.y, coefOnly != 0 ? c.y : V{});
            EXPECT_TRUE(coefOnly != 0 ? r.err == -7 : twtest::IsFailureNaN(r.err));
        }
    }
}

TEST_P(FitRobust, LineLimitsAndExactData) {
    // Two points: the exact line, no pass.
    for (bool lar : {false, true}) {
        const Line r = RunLine(lar, {1, 7}, {1, 3}, {}, 10);
        EXPECT_EQ(r.status, 0);
        EXPECT_EQ(r.slope, 3.0);
        EXPECT_EQ(r.intercept, -2.0);
        EXPECT_EQ(r.iterations, 0);
        EXPECT_EQ(r.err, 0.0);
        EXPECT_EQ(r.y, (V{1, 7}));
    }
    const V x{0, 1, 2, 3, 4, 5, 6, 7}, y{0.1, 1.2, 1.9, 3.3, 3.8, 5.1, 12, 7.05};
    double m = 0, b = 0, mse = 0;
    Array1D<double> plain(y);
    ASSERT_EQ(LinFit_head(plain.h(), Array1D<double>(x).h(), Array1D<double>().h(), &m, &b, &mse), 0);
    // Limit 0: the bisquare line still makes one refit, the least-absolute one returns the start.
    const Line bi = RunLine(false, y, x, {}, 0), lar = RunLine(true, y, x, {}, 0);
    EXPECT_EQ(bi.iterations, 1);
    EXPECT_NE(bi.slope, m);
    EXPECT_EQ(lar.iterations, 0);
    EXPECT_EQ(lar.slope, m);
    EXPECT_EQ(lar.intercept, b);
    // Coefficients only: the same line, y left alone, iterations written.
    const Line full = RunLine(false, y, x, {}, 20), coef = RunLine(false, y, x, {}, 20, 1);
    EXPECT_EQ(coef.slope, full.slope);
    EXPECT_EQ(coef.iterations, full.iterations);
    EXPECT_EQ(coef.y, y);
    EXPECT_EQ(coef.err, -7.0);
    // Exactly on a line: the scale is 0 and no refit happens.
    const Line exact = RunLine(false, {1, 3, 5, 7, 9}, {0, 1, 2, 3, 4}, {}, 20);
    EXPECT_EQ(exact.status, 0);
    EXPECT_EQ(exact.iterations, 0);
    EXPECT_NEAR(exact.slope, 2.0, 1e-14);
}

TEST_P(FitRobust, GeneralStatusesAndWeightHandback) {
    const V rows{1, 0, 1, 1, 1, 2, 1, 3, 1, 4};
    const V y{1, 3, 5, 7, 9};
    struct Case {
        V h;
        int32_t n, k;
        V y, w;
        int32_t status;
    };
    V nanRows = rows;
    nanRows[3] = kNaNIn;
    const Case cases[] = {
        {nanRows, 5, 2, y, {}, NanInfErr},
        {rows, 5, 2, {1, 2, 3}, {}, EqSamplesErr},
        {rows, 5, 2, y, {1, 1}, EqSamplesErr},
        {V(rows.begin(), rows.begin() + 2), 1, 2, {1}, {}, PolyOrderErr},
        // The wild third point is rejected, and n - k = 1 zero leaves nothing to fit.
        {V(rows.begin(), rows.begin() + 6), 3, 2, {0, 1, 10}, {}, NoRootErr},
    };
    for (const Case& c : cases) {
        Array2D<double> h(c.n, c.k, c.h), cov;
        Array1D<double> coef, fit, w(c.w);
        double mse = 0;
        int32_t it = 5;
        EXPECT_EQ(GenBisquareFit_Weight_head(h.h(), Array1D<double>(c.y).h(), w.h(), 0, 1, 1e-6, &it,
                                             coef.h(), fit.h(), cov.h(), &mse),
                  c.status);
        EXPECT_TRUE(coef.vec().empty() && fit.vec().empty() && cov.rows() == 0 && w.vec().empty());
        EXPECT_TRUE(twtest::IsFailureNaN(mse));
    }
    // A failed resize of the empty weights array is reported as the fitting family reports any.
    {
        Array2D<double> h(5, 2, rows), cov;
        Array1D<double> coef, fit, w;
        double mse = 0;
        int32_t it = 5;
        TWRTFailResizeAt(1);
        const int32_t status = GenBisquareFit_Weight_head(h.h(), Array1D<double>(y).h(), w.h(), 0, 0, 1e-6, &it,
                                                          coef.h(), fit.h(), cov.h(), &mse);
        TWRTFailResizeAt(0);
        EXPECT_EQ(status, OutOfMemoryErr);
        EXPECT_TRUE(w.vec().empty() && coef.vec().empty() && twtest::IsFailureNaN(mse));
    }
    // Exact data: the mse is below the threshold before any pass, so the weights stay as passed;
    // an empty weights array comes back as ones.
    for (const V& w0 : {V{2, 2, 2, 2, 2}, V{}}) {
        Array2D<double> h(5, 2, rows), cov;
        Array1D<double> coef, fit, w(w0);
        double mse = 1;
        int32_t it = 5;
        ASSERT_EQ(GenBisquareFit_Weight_head(h.h(), Array1D<double>(y).h(), w.h(), 0, 0, 1e-6, &it, coef.h(),
                                             fit.h(), cov.h(), &mse),
                  0);
        EXPECT_EQ(it, 0);
        EXPECT_EQ(w.vec(), w0.empty() ? V(5, 1.0) : w0);
        EXPECT_NEAR(coef.vec()[1], 2.0, 1e-13);
    }
    // The least-absolute-residual core leaves the iterations argument as it found it.
    Array2D<double> h(5, 2, rows), cov;
    Array1D<double> coef, fit;
    double mae = 0;
    int32_t it = 40;
    EXPECT_EQ(GenLARFit_head(h.h(), Array1D<double>({1, 3, 5, 7, 19}).h(), Array1D<double>().h(), 0, 0, 1e-9,
                             -1, &it, coef.h(), fit.h(), cov.h(), &mae),
              0);
    EXPECT_EQ(it, 40);
    EXPECT_NEAR(coef.vec()[1], 2.0, 2e-3);  // the wild last point is discounted (least squares: 4)
}

TEST_P(FitRobust, ModelStatusesAndGuessLength) {
    const V x{0.5, 1, 1.5, 2, 2.5, 3}, y{1.2, 1.9, 3.1, 5.2, 8.1, 13.6};
    struct Case {
        int which;  // 0 bisquare exp, 1 least-absolute exp, 2 bisquare power
        V x, guess;
        uint16_t method;
        int32_t status;
    };
    const Case cases[] = {
        {0, x, {}, 2, InvalidSelectorErr},
        {1, x, {1, 1, 1}, 1, InitialLengthWarn},  // first two used
        {0, x, {1}, 1, InitialLengthWarn},        // too short: ignored
        {2, {0, 1, 1.5, 2, 2.5, 3}, {}, 1, BadDataRangeErr},
        {1, {1, 2}, {}, 1, EqSamplesErr},
    };
    for (const Case& c : cases) {
        Array1D<double> yh(y);
        double a = 0, b = 0, e = 0;
        int32_t it = 20;
        const Array1D<double> xh(c.x), w, g(c.guess);
        const int32_t s =
            c.which == 0 ? BiExpFit_head(yh.h(), xh.h(), w.h(), 1e-6, g.h(), c.method, &a, &b, &e, &it, -1, 0)
            : c.which == 1
                ? LARExpFit_head(yh.h(), xh.h(), w.h(), 1e-6, g.h(), c.method, &a, &b, &e, &it, -1, 0)
                : BiPowerFit_head(yh.h(), xh.h(), w.h(), 1e-6, g.h(), &a, &b, &e, &it, -1, 0);
        EXPECT_EQ(s, c.status);
        if (s < 0) {
            EXPECT_TRUE(yh.vec().empty() && twtest::IsFailureNaN(a) && twtest::IsFailureNaN(e));
        } else {
            EXPECT_NEAR(b, std::log(13.6 / 1.2) / 2.5, 0.1);  // roughly exponential growth
            EXPECT_EQ(yh.vec().size(), y.size());
        }
    }
}

TEST_P(FitRobust, PolynomialCoefficientsOnlyLeavesBestFit) {
    const V x{0, 1, 2, 3, 4, 5}, y{1, 2, 5, 10, 30, 26};
    Array1D<double> fit(V{9, 9}), coef;
    double mse = -7;
    int32_t it = 10;
    ASSERT_EQ(
        BiPolyFit_head(Array1D<double>(x).h(), Array1D<double>(y).h(), 2, Array1D<double>().h(), 0,
                       Array1D<int32_t>().h(), Array1D<double>().h(), fit.h(), coef.h(), &mse, 1e-6, &it, 1),
        0);
    EXPECT_EQ(fit.vec(), (V{9, 9}));
    EXPECT_EQ(mse, -7.0);
    EXPECT_EQ(coef.vec().size(), 3u);
    EXPECT_GT(it, 0);
    // Every power fixed: no robust fit runs and no refit is counted.
    it = 10;
    ASSERT_EQ(BiPolyFit_head(Array1D<double>(x).h(), Array1D<double>(y).h(), 1, Array1D<double>().h(), 0,
                             Array1D<int32_t>({1, 0}).h(), Array1D<double>({2, 1}).h(), fit.h(), coef.h(),
                             &mse, 1e-6, &it, 0),
              0);
    EXPECT_EQ(it, 0);
    EXPECT_EQ(coef.vec(), (V{1, 2}));
    EXPECT_EQ(fit.vec(), (V{1, 3, 5, 7, 9, 11}));
    // Order n is too high for six points in both kinds.
    EXPECT_EQ(LARPolyFit_head(Array1D<double>(x).h(), Array1D<double>(y).h(), 6, Array1D<double>().h(), 0,
                              Array1D<int32_t>().h(), Array1D<double>().h(), fit.h(), coef.h(), &mse, 1e-6,
                              &it, -1, 0),
              PolyOrderErr);
    EXPECT_TRUE(fit.vec().empty() && coef.vec().empty() && twtest::IsFailureNaN(mse));
}

INSTANTIATE_TEST_SUITE_P(Placements, FitRobust, ::testing::Bool(), twtest::PlacementName);

}  // namespace
