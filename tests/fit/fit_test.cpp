// Fitting exports: status order, failure contract and the special cases, with values
// derived by hand (the numerics against NumPy/SciPy live in tests/reference/test_fit.py).
#include <gtest/gtest.h>

#include <cmath>
#include <functional>
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
const double kInf = std::numeric_limits<double>::infinity();

class Fit : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

V Gauss(const V& x, double a, double c, double s) {
    V y;
    for (double v : x) y.push_back(a * std::exp(-0.5 * ((v - c) / s) * ((v - c) / s)));
    return y;
}

TEST_P(Fit, LineStatusesAndFailureContract) {
    struct Case {
        V y, x, w;
        int32_t status;
    };
    const Case cases[] = {
        {{}, {}, {}, TooFewSamples2Err},
        {{1}, {1}, {}, TooFewSamples2Err},
        {{1}, {1, 2}, {}, EqSamplesErr},  // the length test comes first
        {{1, 2, 3}, {1, 2, 3}, {1, 1}, EqSamplesErr},
        {{1, 2, 3}, {1, 2, 3}, {1, kNaNIn, 1}, NanInfErr},
        {{1, 2, 3}, {1, 2, 3}, {0, 2, 0}, DegenerateDataErr},
    };
    for (const Case& c : cases) {
        Array1D<double> y(c.y);
        double m = 0, b = 0, mse = 0;
        EXPECT_EQ(LinFit_head(y.h(), Array1D<double>(c.x).h(), Array1D<double>(c.w).h(), &m, &b, &mse), c.status);
        EXPECT_EQ(y.size(), 0);
        EXPECT_TRUE(twtest::IsFailureNaN(m) && twtest::IsFailureNaN(b) && twtest::IsFailureNaN(mse));
        int32_t status = 0;
        EXPECT_EQ(LinFitCoef80_head(Array1D<double>(c.y).h(), Array1D<double>(c.x).h(), Array1D<double>(c.w).h(),
                                    &m, &b, &status),
                  0);
        EXPECT_EQ(status, c.status);
    }
}

TEST_P(Fit, LineThroughTwoPointsAndAllZeroWeightsIsUnweighted) {
    Array1D<double> y{1, 3};
    double m = 0, b = 0, mse = 1;
    EXPECT_EQ(LinFit_head(y.h(), Array1D<double>{0, 1}.h(), Array1D<double>().h(), &m, &b, &mse), 0);
    EXPECT_EQ(m, 2.0);
    EXPECT_EQ(b, 1.0);
    EXPECT_EQ(mse, 0.0);
    EXPECT_EQ(y.vec(), (V{1, 3}));

    const V x{0.5, 1.5, 2, 4, 7}, data{1, 2.5, 2.9, 5.2, 8.8};
    Array1D<double> plain(data), zeroWeighted(data);
    double m1, b1, e1, m2, b2, e2;
    LinFit_head(plain.h(), Array1D<double>(x).h(), Array1D<double>().h(), &m1, &b1, &e1);
    EXPECT_EQ(LinFit_head(zeroWeighted.h(), Array1D<double>(x).h(), Array1D<double>(V(5, 0.0)).h(), &m2, &b2, &e2),
              0);
    EXPECT_EQ(m1, m2);
    EXPECT_EQ(b1, b2);
    EXPECT_EQ(e1, e2);
    EXPECT_EQ(plain.vec(), zeroWeighted.vec());
}

struct PolyResult {
    int32_t status;
    V coef, fit;
    double mse;
};

PolyResult Poly(const V& x, const V& y, int32_t order, int32_t method, const std::vector<int32_t>& powers = {},
                const V& values = {}) {
    Array1D<double> fit, coef;
    double mse = 0;
    const int32_t s = PolyFit80_head(Array1D<double>(x).h(), Array1D<double>(y).h(), order, method,
                                     Array1D<int32_t>(powers).h(), Array1D<double>(values).h(), fit.h(), coef.h(),
                                     &mse);
    return {s, coef.vec(), fit.vec(), mse};
}

TEST_P(Fit, PolynomialStatuses) {
    const V x{0, 1, 2, 3}, y{1, 2, 5, 10};
    struct Case {
        int32_t order, method;
        std::vector<int32_t> powers;
        V values;
        int32_t status;
    };
    const Case cases[] = {
        {4, 0, {}, {}, PolyOrderErr},       // order n
        {-1, 0, {}, {}, NegativeOrderErr},
        {2, 7, {}, {}, InvalidSelectorErr},
        {2, 0, {1}, {}, EqSamplesErr},
        {4, 0, {9}, {1}, PolyOrderErr},     // passes the frame's count, five free columns on four points
    };
    for (const Case& c : cases) {
        const PolyResult r = Poly(x, y, c.order, c.method, c.powers, c.values);
        EXPECT_EQ(r.status, c.status) << c.order;
        EXPECT_TRUE(r.coef.empty() && r.fit.empty() && twtest::IsFailureNaN(r.mse));
    }
    const PolyResult r = Poly(x, y, 3, 0);  // order n - 1 interpolates 1 + x^2
    ASSERT_EQ(r.status, 0);
    for (int i = 0; i < 4; ++i) {
        EXPECT_NEAR(r.coef[i], (V{1, 0, 1, 0})[i], 1e-12);
        EXPECT_NEAR(r.fit[i], y[i], 1e-12);
    }
    EXPECT_LT(std::fabs(r.mse), 1e-24);
}

TEST_P(Fit, PolynomialOrderAbove25AndFixedTerms) {
    V x, y;
    for (int i = 0; i < 40; ++i) {
        x.push_back(0.5 + i * 0.015);
        y.push_back(std::sin(3 * x.back()));
    }
    const PolyResult full = Poly(x, y, 25, 0), clamped = Poly(x, y, 30, 0);
    ASSERT_EQ(full.status, 0);
    ASSERT_EQ(clamped.status, OrderClampedWarn);
    ASSERT_EQ(clamped.coef.size(), 31u);
    EXPECT_EQ(V(clamped.coef.begin(), clamped.coef.begin() + 26), full.coef);
    EXPECT_EQ(V(clamped.coef.begin() + 26, clamped.coef.end()), V(5, 0.0));

    // Every power fixed but 28: top is then the order and the one free column is x^28.
    std::vector<int32_t> powers;
    V values, y28;
    for (int32_t p = 0; p <= 30; ++p)
        if (p != 28) powers.push_back(p), values.push_back(0.0);
    for (double v : x) y28.push_back(2 * std::pow(v, 28));
    const PolyResult one = Poly(x, y28, 30, 0, powers, values);
    EXPECT_EQ(one.status, OrderClampedWarn);
    EXPECT_NEAR(one.coef[28], 2.0, 1e-12);

    // All powers fixed: no solve (method 7 is never looked at); the fit is their polynomial.
    const PolyResult all = Poly(x, y, 2, 7, {0, 1, 2}, {1, 2, 3});
    EXPECT_EQ(all.status, 0);
    EXPECT_EQ(all.coef, (V{1, 2, 3}));
    for (size_t i = 0; i < x.size(); ++i) EXPECT_EQ(all.fit[i], (3 * x[i] + 2) * x[i] + 1);
}

TEST_P(Fit, GeneralLeastSquaresStatuses) {
    const V rows{1, 0, 1, 1, 1, 2, 1, 3};
    const V zeroColumn{1, 0, 1, 0, 1, 0, 1, 0};
    const V withNaN{1, 0, 1, kNaNIn, 1, 2, 1, 3};
    struct Case {
        const V* h;
        int32_t n, k;
        V y, third;
        int32_t method, status;
    };
    const Case cases[] = {
        {&rows, 4, 2, {1, 2, 3}, {}, 7, EqSamplesErr},  // y against rows first
        {&rows, 4, 2, {1, 2, 3, 4}, {1, 1, 1}, 0, EqSamplesErr},
        {&rows, 4, 2, {1, 2, 3, 4}, {1, 1, 1, 1, 9}, 0, 0},  // a longer third array is accepted
        {&rows, 4, 2, {1, 2, 3, 4}, {}, 7, InvalidSelectorErr},
        {&rows, 4, 2, {1, 2, 3, 4}, {}, -1, InvalidSelectorErr},
        {&rows, 1, 8, {1}, {}, 0, PolyOrderErr},
        {&rows, 4, 0, {1, 2, 3, 4}, {}, 0, OrderNotPositiveErr},
        {&withNaN, 4, 2, {1, 2, 3, 4}, {}, 0, NanInfErr},
        {&withNaN, 4, 2, {1, 2, 3, 4}, {}, 2, NanInfErr},
        {&zeroColumn, 4, 2, {1, 2, 3, 4}, {}, 1, SingularMatrixErr},
        {&zeroColumn, 4, 2, {1, 2, 3, 4}, {}, 4, SingularMatrixErr},
        {&zeroColumn, 4, 2, {1, 2, 3, 4}, {}, 5, NotPositiveDefiniteErr},
    };
    for (const Case& c : cases) {
        Array2D<double> h(c.n, c.k, V(c.h->begin(), c.h->begin() + c.n * c.k)), cov;
        Array1D<double> coef, fit;
        double mse = 0;
        EXPECT_EQ(GenLSFit80_head(h.h(), Array1D<double>(c.y).h(), Array1D<double>(c.third).h(), c.method, 1,
                                  coef.h(), fit.h(), cov.h(), &mse),
                  c.status)
            << c.method;
        if (c.status == 0) {
            EXPECT_EQ(coef.size(), 2);
            EXPECT_NEAR(coef[0], 1.0, 1e-14);  // y = 1 + x exactly
            EXPECT_NEAR(coef[1], 1.0, 1e-14);
            EXPECT_EQ(cov.rows() * cov.cols(), 4);
        } else {
            EXPECT_EQ(coef.size() + fit.size() + cov.rows() + cov.cols(), 0);
            EXPECT_TRUE(twtest::IsFailureNaN(mse));
        }
    }
    Array2D<double> h(4, 2, rows), cov;
    Array1D<double> coef, fit;
    double mse = 0;
    EXPECT_EQ(GenLSFit_head(h.h(), Array1D<double>{1, 2, 3, 4}.h(), Array1D<double>().h(), 3, 0, coef.h(), fit.h(),
                            cov.h(), &mse),
              0);
    EXPECT_EQ(cov.rows() + cov.cols(), 0);  // covariance not wanted
}

TEST_P(Fit, GoodnessOfFit) {
    struct Case {
        V y, f, w;
        int32_t dof, status;
        double sse, r2, rmse;
    };
    const Case cases[] = {
        {{2, 2, 2}, {2, 2, 2}, {}, 1, 0, 0, 1, 0},               // sst = 0, sse = 0
        {{2, 2, 2}, {2, 3, 2}, {}, 1, 0, 1, kInf, 1},            // sst = 0, sse > 0
        {{1, 3}, {1, 3}, {}, 0, 0, 0, 1, kNaNIn},                // dof 0 becomes n - 2 = 0
        {{1, 2, 3, 6}, {1, 2, 4, 6}, {1, 1, 2, -1}, 2, 0, 2, 1.5, 1},  // signed weights: sst = 4 + 1 + 0 - 9
        {{}, {}, {}, 1, EmptyArrayErr, 0, 0, 0},
        {{1, 2}, {1}, {}, 1, EqSamplesErr, 0, 0, 0},
        {{1, 2}, {1, 2}, {1}, 1, EqSamplesErr, 0, 0, 0},
        {{1}, {1}, {}, 0, TooFewSamples2Err, 0, 0, 0},
        {{1, 2}, {1, 2}, {}, 2, SampleCountErr, 0, 0, 0},
    };
    for (const Case& c : cases) {
        double sse = 0, r2 = 0, rmse = 0;
        EXPECT_EQ(GoodnessOfFit_head(Array1D<double>(c.y).h(), Array1D<double>(c.f).h(), Array1D<double>(c.w).h(),
                                     c.dof, &sse, &r2, &rmse),
                  c.status);
        if (c.status != 0) {
            EXPECT_TRUE(twtest::IsFailureNaN(sse) && twtest::IsFailureNaN(r2) && twtest::IsFailureNaN(rmse));
            continue;
        }
        EXPECT_EQ(sse, c.sse);
        EXPECT_EQ(r2, c.r2);
        if (std::isnan(c.rmse))
            EXPECT_TRUE(std::isnan(rmse));
        else
            EXPECT_EQ(rmse, c.rmse);
    }
}

struct ModelResult {
    int32_t status;
    double a, b, mse;
    int32_t iterations;
    V y;
};

ModelResult Exp(const V& y, const V& x, const V& guess, uint16_t method, int32_t limit) {
    Array1D<double> yh(y);
    ModelResult r{0, 0, 0, 0, limit, {}};
    r.status = ExpFit80_head(yh.h(), Array1D<double>(x).h(), Array1D<double>().h(), -1, Array1D<double>(guess).h(),
                             method, &r.a, &r.b, &r.mse, &r.iterations, -1);
    r.y = yh.vec();
    return r;
}

TEST_P(Fit, ExponentialMethodsGuessesAndFailures) {
    const V x{0, 1, 2, 3, 4}, y{4, 2.1, 0.9, 0.52, 0.24};
    const ModelResult estimate = Exp(y, x, {}, 0, 7);
    EXPECT_EQ(estimate.status, 0);
    EXPECT_EQ(estimate.iterations, 7);  // method 0 does not iterate

    struct Case {
        V guess;
        int32_t status;
        double a, b;  // NaN: the guess-free estimate
    };
    const Case cases[] = {
        {{3, -0.5}, 0, 3, -0.5},
        {{3, -0.5, 99}, InitialLengthWarn, 3, -0.5},
        {{3}, InitialLengthWarn, kNaNIn, kNaNIn},
    };
    for (const Case& c : cases) {
        const ModelResult r = Exp(y, x, c.guess, 1, -1);  // negative limit: start values, no step
        EXPECT_EQ(r.status, c.status);
        EXPECT_EQ(r.iterations, 0);
        EXPECT_EQ(r.a, std::isnan(c.a) ? estimate.a : c.a);
        EXPECT_EQ(r.b, std::isnan(c.b) ? estimate.b : c.b);
    }

    EXPECT_EQ(Exp(y, x, {3, -0.5}, 1, 0).iterations, 1);  // a limit of L runs up to L + 1 steps

    const ModelResult other = Exp(y, x, {}, 5, 3);
    EXPECT_EQ(other.status, 0);
    EXPECT_TRUE(twtest::IsFailureNaN(other.a) && twtest::IsFailureNaN(other.b) && twtest::IsFailureNaN(other.mse));
    EXPECT_EQ(other.y, y);
    EXPECT_EQ(other.iterations, 3);

    const ModelResult negative = Exp({-4, -2.1, -0.9, 0.3, -0.24}, x, {}, 1, 50);
    EXPECT_EQ(negative.status, 0);
    EXPECT_LT(negative.a, -3);
    EXPECT_LT(negative.b, 0);

    for (const V& bad : {V{0, 0, 0, 0, 0}, V{1}}) {
        const ModelResult r = Exp(bad, V(x.begin(), x.begin() + static_cast<long>(bad.size())), {}, 1, 5);
        EXPECT_EQ(r.status, bad.size() == 1 ? TooFewSamples2Err : PolyOrderErr);
        EXPECT_TRUE(r.y.empty() && twtest::IsFailureNaN(r.a) && twtest::IsFailureNaN(r.mse));
    }
}

TEST_P(Fit, PowerAndLogarithmDomains) {
    double a = 0, b = 0, mse = 0;
    int32_t it = 10;
    Array1D<double> y{1, 2, 3};
    EXPECT_EQ(PowerFit_head(y.h(), Array1D<double>{0, 1, 2}.h(), Array1D<double>().h(), 0, Array1D<double>().h(), &a,
                            &b, &mse, &it, 0),
              BadDataRangeErr);
    EXPECT_EQ(y.size(), 0);

    struct Case {
        V y, x;
        double base;
        int32_t fitStatus, coefStatus;
        double a, b, f0;
    };
    const Case cases[] = {
        {{1, 2}, {1, 2, 3}, 0, EqSamplesErr, BadDataRangeErr, 0, 0, 0},  // lengths first, or base first
        {{1, 2, 3}, {-1, 1, 2}, 10, NonPositiveDataErr, NonPositiveDataErr, 0, 0, 0},
        {{1, 2, 3}, {0, 1, 2}, 10, NonPositiveDataErr, NonPositiveDataErr, 0, 0, 0},
        // Constant y: a = 0 and b = the sign of x, so the model (no constant term) fits 0.
        {{3, 3, 3, 3}, {1, 2, 4, 8}, 2, 0, 0, 0, 1, 0},
        {{3, 3, 3, 3}, {-1, -2, -4, -8}, 2, 0, 0, 0, -1, 0},
        {{1, 2, 3}, {10, 100, 1000}, 10, 0, 0, 1, 1, 1},  // y = log10(x)
        {{1, 2, 3}, {-10, -100, -1000}, 10, 0, 0, 1, -1, 1},
    };
    for (const Case& c : cases) {
        Array1D<double> yh(c.y);
        const Array1D<double> xh(c.x), none;
        EXPECT_EQ(LogFit_head(yh.h(), xh.h(), none.h(), c.base, &a, &b, &mse), c.fitStatus);
        if (c.fitStatus == 0) {
            EXPECT_NEAR(a, c.a, 1e-14);
            EXPECT_NEAR(b, c.b, 1e-13);
            EXPECT_NEAR(yh[0], c.f0, 1e-13);
        } else {
            EXPECT_EQ(yh.size(), 0);
        }
        EXPECT_EQ(LogFitCoef_head(Array1D<double>(c.y).h(), xh.h(), none.h(), c.base, &a, &b), c.coefStatus);
    }
}

struct GaussResult {
    int32_t status;
    double a, c, s, mse;
    int32_t iterations;
    V y;
};

GaussResult Peak(const V& y, const V& x, const V& w, const V& guess, int32_t limit, double tol = 0) {
    Array1D<double> yh(y);
    GaussResult r{0, 0, 0, 0, 0, limit, {}};
    r.status = GaussianPeakFit_head(yh.h(), Array1D<double>(x).h(), Array1D<double>(w).h(), tol,
                                    Array1D<double>(guess).h(), &r.a, &r.c, &r.s, &r.mse, &r.iterations, 0);
    r.y = yh.vec();
    return r;
}

TEST_P(Fit, GaussianStartsAndSpecialShapes) {
    const V x{-2, -1, 0, 1, 2, 3};
    // Only the peak stands out: the three-point form recovers the exact Gaussian, no step.
    const GaussResult spike = Peak(Gauss(x, 2, 0.3, 0.25), x, {}, {}, 100);
    EXPECT_EQ(spike.status, 0);
    EXPECT_EQ(spike.iterations, 0);
    EXPECT_NEAR(spike.a, 2, 1e-11);
    EXPECT_NEAR(spike.c, 0.3, 1e-12);
    EXPECT_NEAR(spike.s, 0.25, 1e-12);

    // A flat top starts at 1.2 times the top, centred on the equal samples, s = sqrt(their span).
    const GaussResult flat = Peak({0, 0.1, 4, 4, 4, 0.1}, x, {}, {}, -1);
    EXPECT_EQ(flat.status, 0);
    EXPECT_EQ(flat.iterations, 0);
    EXPECT_EQ(flat.a, 4.8);
    EXPECT_EQ(flat.c, 1.0);
    EXPECT_EQ(flat.s, std::sqrt(2.0));

    // A negative s comes back positive; a negative peak fits with a negative amplitude.
    const GaussResult negS = Peak(Gauss(x, 1, 0.5, 1), x, {}, {1, 0.5, -1}, -1);
    EXPECT_EQ(negS.s, 1.0);
    EXPECT_EQ(negS.y, Gauss(x, 1, 0.5, 1));
    const GaussResult down = Peak(Gauss(x, -3, 0.4, 1.1), x, {}, {-2.5, 0.2, 1.4}, 1000, 1e-10);
    EXPECT_EQ(down.status, 0);
    EXPECT_NEAR(down.a, -3, 1e-3);
    EXPECT_NEAR(down.c, 0.4, 1e-3);

    // A start mse at or above (1 - tol) / tol ends the descent before its first step.
    const GaussResult stuck = Peak(Gauss(x, 100, 0.5, 1), x, {}, {1, 0, 1}, 100, 0.5);
    EXPECT_EQ(stuck.iterations, 0);
    EXPECT_EQ(stuck.a, 1);

    const GaussResult oneElement = Peak(Gauss(x, 2, 0.3, 0.25), x, {}, {7}, 100);
    EXPECT_EQ(oneElement.status, InitialLengthWarn);
    EXPECT_EQ(oneElement.a, spike.a);

    struct Case {
        V y, x, w;
        int32_t status;
    };
    const Case failures[] = {
        {{0, 0, 5, 0, 0}, {1, 2, 3, 4, 5}, {}, ZeroAmplitudeErr},  // spike on an exactly zero background
        {{1, 2}, {1, 2}, {}, TooFewSamples3Err},
        {{1, 2, 3, 2, 1}, {1, 2, 3, 4, 5}, {1, 0, 0, 0, 1}, DegenerateDataErr},
        {{1, 2, 3, 2, 1}, {1, 2, kInf, 4, 5}, {}, NanInfErr},
        {{1, 2, 3}, {1, 2}, {}, EqSamplesErr},
    };
    for (const Case& c : failures) {
        const GaussResult r = Peak(c.y, c.x, c.w, {}, 10);
        EXPECT_EQ(r.status, c.status);
        EXPECT_TRUE(r.y.empty() && twtest::IsFailureNaN(r.a) && twtest::IsFailureNaN(r.s) &&
                    twtest::IsFailureNaN(r.mse));
    }
}

INSTANTIATE_TEST_SUITE_P(Placements, Fit, ::testing::Bool(), twtest::PlacementName);

}  // namespace
