// Splines, tableau interpolation and outlier removal: statuses in test order and hand-worked edge
// cases (the numerics against SciPy live in tests/reference/test_fit_spline.py).
#include <gtest/gtest.h>

#include <limits>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/fit.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using twrt::Array2D;
using V = std::vector<double>;
using I = std::vector<int32_t>;
const double kNaNIn = std::numeric_limits<double>::quiet_NaN();

class FitSpline : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(FitSpline, Interpolation) {
    enum { Spline, Table, Poly, Rat };
    const V x4{0, 1, 2, 3}, y4{1, 3, 2, 5}, bad{0, 1, 0};
    struct Case {
        const char* what;
        int kind;
        V y, x;
        double xi;
        int32_t status;
        double want;
    } const cases[] = {
        {"one point", Spline, {1}, {2}, 0, TooFewSamples2Err, 0},
        {"repeated x, descending", Spline, {1, 2, 3}, {2, 2, 1}, 0, NotAscendingErr, 0},
        {"turn back onto the same x", Spline, {1, 2, 3}, bad, 0, NotAscendingErr, 0},
        {"table of one point", Table, {1}, {2}, 2, NotAscendingErr, 0},
        {"table of unequal lengths", Table, {1, 2}, {1, 2, 3}, 2, EqSamplesErr, 0},
        {"polynomial of one point", Poly, {7}, {1}, 5, 0, 7},
        {"polynomial, repeated x", Poly, {1, 2, 3}, bad, 0.5, NotAscendingErr, 0},
        {"rational at an entry", Rat, y4, x4, 3, 0, 5},
        {"rational, repeated x", Rat, {1, 2, 3}, bad, 0.5, NotAscendingErr, 0},
        // d[0] = -1e-10 + 1e-10 is exactly 0 and meets c[1] = 0: the first denominator vanishes.
        {"rational, zero denominator", Rat, {-1e-10, 0, 1}, {0, 1, 2}, 0.5, ZeroDenominatorErr, 0},
    };
    for (const Case& c : cases) {
        Array1D<double> y(c.y), x(c.x), y2(V(c.y.size(), 0.0));
        int32_t s = 7;
        double v = 1, e = 1, xi = c.xi, natural = 1e30;
        Array1DHandle hy = y.h(), hx = x.h(), h2 = y2.h();
        if (c.kind == Spline) Spline_head(hy, hx, &natural, &natural, h2, &s);
        if (c.kind == Table) SpInterp_head(&hy, &hx, &h2, &xi, &v, &s);
        if (c.kind >= Poly) (c.kind == Poly ? PolyInterp_head : RatInterp_head)(hy, hx, &xi, &v, &e, &s);
        EXPECT_EQ(s, c.status) << c.what;
        if (c.kind == Spline) {
            EXPECT_EQ(y2.size(), 0) << c.what;
        } else if (s == 0) {
            EXPECT_NEAR(v, c.want, 1e-12) << c.what;
            EXPECT_TRUE(c.kind != Rat || e == 0.0) << c.what;
        } else {
            EXPECT_TRUE(twtest::IsFailureNaN(v)) << c.what;
        }
    }
    // A null pointer or a null handle is an empty table.
    Array1D<double> t{1, 2};
    Array1DHandle h = t.h(), none = nullptr;
    double xi = 1, v = 0;
    int32_t s = 0;
    SpInterp_head(&h, nullptr, &h, &xi, &v, &s);
    EXPECT_EQ(s, EmptyArrayErr);
    SpInterp_head(&h, &h, &none, &xi, &v, &s);
    EXPECT_EQ(s, EmptyArrayErr);
}

TEST_P(FitSpline, SmoothingSpline) {
    const V x5{0, 1, 2, 3, 4}, y5{1, 2, 0, 2, 1}, ones{1, 1, 1, 1, 1};
    struct Case {
        const char* what;
        V y, x, w, b;
        double p;
        int32_t status;
    } const cases[] = {
        {"empty", {}, {}, {}, {}, 0.5, EmptyArrayErr},
        {"balance of n", y5, x5, {}, ones, 0.5, EqSamplesErr},
        {"one point", {1}, {0}, {}, {}, 0.5, TooFewSamples2Err},
        {"x descending", y5, {4, 3, 2, 1, 0}, {}, {}, 0.5, NotAscendingErr},
        {"zero weight", y5, x5, {1, 0, 1, 1, 1}, {}, 0.5, DegenerateDataErr},
        {"zero balance", y5, x5, ones, {1, 1, 1, 0}, 0.5, DegenerateDataErr},
        {"two points stay, x unchecked", {1, 2}, {1, 1}, {}, {}, 0.3, 0},
        {"smoothness 1 keeps y, x unchecked", y5, {0, 2, 2, 5, 3}, {}, {}, 1.0, 0},
    };
    for (const Case& c : cases) {
        Array1D<double> y(c.y), x(c.x), w(c.w), b(c.b);
        double e = 1;
        EXPECT_EQ(CubicSplineFit_head(y.h(), x.h(), w.h(), b.h(), c.p, &e), c.status) << c.what;
        EXPECT_EQ(y.vec(), c.status == 0 ? c.y : V{}) << c.what;
        EXPECT_TRUE(c.status == 0 ? e == 0 : twtest::IsFailureNaN(e)) << c.what;
    }
}

TEST_P(FitSpline, BSpline) {
    const V pts{0, 0, 1, 1, 2, 0, 3, 1, 4, 0};  // five points in the plane
    struct Case {
        const char* what;
        int32_t rows;
        V data, w, t;
        int32_t degree, m;
        uint16_t kind;
        int32_t status;
    } const cases[] = {
        {"no elements", 0, {}, {}, {}, 1, 2, 0, EmptyArrayErr},
        {"parameters of another length", 5, pts, {}, {0, 1}, 1, 2, 0, EqSamplesErr},
        {"degree 0", 5, pts, {}, {}, 0, 2, 0, OrderNotPositiveErr},
        {"m - 1 below the degree", 5, pts, {}, {}, 3, 3, 0, PolyOrderErr},
        {"one sample, before m > n", 1, {1, 2}, {}, {}, 1, 2, 0, TooFewSamples2Err},
        {"more control points than samples", 5, pts, {}, {}, 1, 6, 0, PolyOrderErr},
        {"parameterisation 3", 5, pts, {}, {}, 1, 2, 3, InvalidSelectorErr},
        {"zero weight", 5, pts, {1, 1, 0, 1, 1}, {}, 1, 2, 0, DegenerateDataErr},
        {"descent before NaN", 5, pts, {}, {0, kNaNIn, 3, 2, 4}, 1, 2, 0, NotAscendingErr},
        {"NaN parameter", 5, pts, {}, {0, 1, kNaNIn, 3, 4}, 1, 2, 0, NanInfErr},
        // Equal parameters map to u = 0 everywhere: the normal matrix is singular.
        {"no parameter span", 5, pts, {}, {2, 2, 2, 2, 2}, 1, 3, 0, NotPositiveDefiniteErr},
    };
    for (const Case& c : cases) {
        Array2D<double> data(c.rows, c.rows ? 2 : 0, c.data), control;
        Array1D<double> w(c.w), t(c.t);
        double mse = 1;
        EXPECT_EQ(BSplineFit_head(data.h(), w.h(), t.h(), c.degree, c.m, c.kind, control.h(), &mse), c.status)
            << c.what;
        EXPECT_EQ(data.rows() + data.cols() + control.rows() + control.cols(), 0) << c.what;
        EXPECT_TRUE(twtest::IsFailureNaN(mse)) << c.what;
    }
}

struct Removal {
    int32_t status;
    V y, x, w;
    I removed;
    std::vector<uint8_t> mask;
};

Removal Remove(const V& y, const V& x, const V& w, const V& range, uint16_t selector,
               const I* list = nullptr) {
    Array1D<double> ya(y), xa(x), wa(w), ra(range), yk, xk, wk;
    Array1D<int32_t> removed, la(list != nullptr ? *list : I{});
    Array1D<uint8_t> mask;
    const int32_t s = list != nullptr ? RmvOutlierIndx_head(ya.h(), xa.h(), wa.h(), la.h(), yk.h(), xk.h(),
                                                            wk.h(), mask.h())
                                      : RmvOutlierRng_head(ya.h(), xa.h(), wa.h(), ra.h(), selector, yk.h(),
                                                           xk.h(), wk.h(), removed.h());
    return {s, yk.vec(), xk.vec(), wk.vec(), removed.vec(), mask.vec()};
}

TEST_P(FitSpline, Outliers) {
    const V y{1, 2, 3}, x{4, 5, 6};
    const I none, negative{0, -1}, beyond{3}, twice{2, 0, 2};
    struct Case {
        const char* what;
        V range;
        uint16_t selector;
        const I* list;
        int32_t status;
        V yKept;
    } const cases[] = {
        {"no range", {}, 0, nullptr, EmptyArrayErr, {}},
        {"selector 3, before the range length", {0}, 3, nullptr, InvalidSelectorErr, {}},
        {"one limit", {0}, 1, nullptr, TooFewSamples2Err, {}},
        {"three limits for selector 2", {0, 1, 2}, 2, nullptr, TooFewSamples4Err, {}},
        {"NaN limit", {0, 1, 2, kNaNIn}, 2, nullptr, NanInfErr, {}},
        {"equal limits remove all; an unused NaN is harmless", {2, 2, kNaNIn}, 0, nullptr, 0, {}},
        {"no numbers", {}, 0, &none, EmptyArrayErr, {}},
        {"number -1", {}, 0, &negative, IndexRangeErr, {}},
        {"number n", {}, 0, &beyond, IndexRangeErr, {}},
        {"a number twice", {}, 0, &twice, 0, {2}},
    };
    for (const Case& c : cases) {
        const Removal r = Remove(y, x, {7, 8, 9}, c.range, c.selector, c.list);
        EXPECT_EQ(r.status, c.status) << c.what;
        EXPECT_EQ(r.y, c.yKept) << c.what;
        EXPECT_EQ(r.w.size(), r.y.size()) << c.what;
        EXPECT_EQ(r.removed.size(), c.status != 0 || c.list != nullptr ? 0u : 3 - r.y.size()) << c.what;
        EXPECT_EQ(r.mask.size(), c.status == 0 && c.list != nullptr ? 3u : 0u) << c.what;
    }
    EXPECT_EQ(Remove(y, x, {}, {}, 0, &twice).mask, (std::vector<uint8_t>{1, 0, 1}));
}

INSTANTIATE_TEST_SUITE_P(Placements, FitSpline, ::testing::Bool(), twtest::PlacementName);

}  // namespace
