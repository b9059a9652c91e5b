// Confidence and prediction bounds: the order of the tests with their failure contract (the
// numerics, properties and hand-worked cases live in tests/reference/test_fit_bounds.py).
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/fit.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using V = std::vector<double>;
const double kNaNIn = std::numeric_limits<double>::quiet_NaN();
const double kInf = std::numeric_limits<double>::infinity();

enum Model { Line, Exp, Power, Log, Gauss, Poly };

struct Bands {
    int32_t status;
    V upper, lower, upperParams, lowerParams, delta;
};

using H = Array1DHandle;
using Conf2 = int32_t (*)(H, H, H, double, double, double, H, H, H, H, double*, double*);
using Pred2 = int32_t (*)(H, H, H, double, double, double, H, H);
const Conf2 kConf2[] = {ConfBndLinear_head, ConfBndExp_head, ConfBndPower_head};
const Pred2 kPred2[] = {PredBndLinear_head, PredBndExp_head, PredBndPower_head};

// One call of a confidence (or prediction) export; parameters in argument order. The delta
// scalars start as 7 so that a failure visibly rewrites them.
Bands Call(Model m, bool prediction, const V& y, const V& x, const V& w, const V& p, double level, double base = 10) {
    Array1D<double> ya(y), xa(x), wa(w), up, lo, upp, lop, dc, coef(p);
    double d[3] = {7, 7, 7};
    int32_t s = 0;
    H a = ya.h(), b = xa.h(), c = wa.h();
    if (prediction) {
        if (m <= Power) s = kPred2[m](a, b, c, p[0], p[1], level, up.h(), lo.h());
        if (m == Log) s = PredBndLog_head(a, b, c, base, p[0], p[1], level, up.h(), lo.h());
        if (m == Gauss) s = PredBndGauss_head(a, b, c, p[0], p[1], p[2], level, up.h(), lo.h());
        if (m == Poly) s = PredBndPoly_head(a, b, c, coef.h(), level, up.h(), lo.h());
        return {s, up.vec(), lo.vec(), {}, {}, {}};
    }
    if (m <= Power) s = kConf2[m](a, b, c, p[0], p[1], level, up.h(), lo.h(), upp.h(), lop.h(), &d[0], &d[1]);
    if (m == Log)
        s = ConfBndLog_head(a, b, c, base, p[0], p[1], level, up.h(), lo.h(), upp.h(), lop.h(), &d[0], &d[1]);
    if (m == Gauss)
        s = ConfBndGauss_head(a, b, c, p[0], p[1], p[2], level, up.h(), lo.h(), upp.h(), lop.h(), &d[0], &d[1], &d[2]);
    if (m == Poly) {
        s = ConfBndPoly_head(a, b, c, coef.h(), level, up.h(), lo.h(), upp.h(), lop.h(), dc.h());
        return {s, up.vec(), lo.vec(), upp.vec(), lop.vec(), dc.vec()};
    }
    return {s, up.vec(), lo.vec(), upp.vec(), lop.vec(), V(d, d + (m == Gauss ? 3 : 2))};
}

class FitBounds : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(FitBounds, TestOrderAndFailureContract) {
    const V x5{0.5, 1, 2, 3, 4}, y5{1, 2, 2.5, 3.5, 4}, n3{1, 2, 3};
    struct Case {
        const char* what;
        Model m;
        V y, x, w, p;
        double level, base;
        int32_t status;
    };
    const Case cases[] = {
        {"x shorter, before the count", Line, {1, 2}, {1}, {}, {kNaNIn, 0}, 2, 10, EqSamplesErr},
        {"weights neither 0 nor n", Gauss, y5, x5, {1, 1}, {1, 2, 1}, 0.9, 10, EqSamplesErr},
        {"two samples, before the parameters", Line, {1, 2}, {1, 2}, {}, {kNaNIn, 0}, 2, 10, TooFewSamples3Err},
        {"Gaussian of three", Gauss, n3, n3, {}, {1, 2, 0}, 2, 10, TooFewSamples4Err},
        {"k equal to n", Poly, n3, n3, {}, {1, 1, 1}, 0.9, 10, PolyOrderErr},
        {"no coefficients, no samples", Poly, {}, {}, {}, {}, 0.9, 10, PolyOrderErr},
        {"no coefficients", Poly, y5, x5, {}, {}, 0.9, 10, EmptyArrayErr},
        {"base 0, before the parameters", Log, y5, x5, {}, {kNaNIn, 1}, 0.9, 0, BadDataRangeErr},
        {"negative base", Log, y5, x5, {}, {1, 1}, 0.9, -10, BadDataRangeErr},
        {"NaN base", Log, y5, x5, {}, {1, 1}, 0.9, kNaNIn, BadDataRangeErr},
        {"infinite parameter, before the level", Power, y5, x5, {}, {1, kInf}, 0, 10, NanInfErr},
        {"NaN before s = 0", Gauss, y5, x5, {}, {kNaNIn, 2, 0}, 0.9, 10, NanInfErr},
        {"s = 0, before the level", Gauss, y5, x5, {}, {1, 2, 0}, kNaNIn, 10, ZeroAmplitudeErr},
        {"NaN coefficient", Poly, y5, x5, {}, {1, kNaNIn}, 0.9, 10, NanInfErr},
        {"polynomial weights, before the level", Poly, y5, x5, {1, 1, kInf, 1, 1}, {1, 1}, 0, 10, NanInfErr},
        {"level 0", Line, y5, x5, {}, {1, 1}, 0, 10, ProbabilityRangeErr},
        {"level 1", Exp, y5, x5, {}, {1, 0.1}, 1, 10, ProbabilityRangeErr},
        {"level NaN", Gauss, y5, x5, {}, {4, 2, 1}, kNaNIn, 10, ProbabilityRangeErr},
        {"level negative", Poly, y5, x5, {}, {1, 1}, -0.5, 10, ProbabilityRangeErr},
        {"model weights are not screened before the level", Exp, y5, x5, {1, kNaNIn, 1, 1, 1}, {1, 0.1}, 1, 10,
         ProbabilityRangeErr},
        {"x = 0 in the power model: G not finite", Power, y5, {0, 1, 2, 3, 4}, {}, {1, 0.5}, 0.9, 10, NanInfErr},
        {"x < 0 in the power model", Power, y5, {-1, 1, 2, 3, 4}, {}, {1, 2}, 0.9, 10, NanInfErr},
        {"b x <= 0 in the logarithm", Log, y5, x5, {}, {1, -2}, 0.9, 2.71828, NanInfErr},
        {"NaN model weight reaches G", Exp, y5, x5, {1, kNaNIn, 1, 1, 1}, {1, 0.1}, 0.9, 10, NanInfErr},
        {"infinite x in the polynomial", Poly, y5, {0, 1, kInf, 3, 4}, {}, {1, 1}, 0.9, 10, NanInfErr},
    };
    for (const Case& c : cases) {
        for (bool prediction : {false, true}) {
            const Bands b = Call(c.m, prediction, c.y, c.x, c.w, c.p, c.level, c.base);
            EXPECT_EQ(b.status, c.status) << c.what << (prediction ? " (prediction)" : "");
            EXPECT_TRUE(b.upper.empty() && b.lower.empty() && b.upperParams.empty() && b.lowerParams.empty())
                << c.what;
            if (prediction || c.m == Poly) {
                EXPECT_TRUE(b.delta.empty()) << c.what;
            } else {
                for (double d : b.delta) EXPECT_TRUE(d == 0.0 && !std::signbit(d)) << c.what;
            }
        }
    }
}

TEST_P(FitBounds, ResizeFailureIsOutOfMemory) {
    const V x{0, 1, 2, 3, 4}, y{1, 2.1, 2.9, 4.2, 5};
    // The polynomial confidence export resizes five outputs; each failing resize empties them all.
    for (int32_t k = 1; k <= 5; ++k) {
        TWRTFailResizeAt(k);
        const Bands b = Call(Poly, false, y, x, {}, {1, 1}, 0.95);
        TWRTFailResizeAt(0);
        EXPECT_EQ(b.status, OutOfMemoryErr) << k;
        EXPECT_TRUE(b.upper.empty() && b.lower.empty() && b.upperParams.empty() && b.delta.empty()) << k;
    }
    TWRTFailResizeAt(3);
    const Bands b = Call(Gauss, false, y, x, {}, {5, 4, 2}, 0.95);
    TWRTFailResizeAt(0);
    EXPECT_EQ(b.status, OutOfMemoryErr);
    EXPECT_EQ(b.delta, (V{0, 0, 0}));
}

INSTANTIATE_TEST_SUITE_P(Placements, FitBounds, ::testing::Bool(), twtest::PlacementName);

}  // namespace
