#include <cmath>
#include <limits>

#include "fit/bounded.hpp"
#include "fit/robust.hpp"
#include "fit/fit_frame.hpp"
#include "frame/frame.hpp"
#include "twanlys/fit.h"

using namespace tw;

namespace {

constexpr double kInf = std::numeric_limits<double>::infinity();

// The first p bounds, or no bounds at all when both arrays are empty.
Status ReadBounds(Frame& f, Handle lower, Handle upper, int32_t p, double* lo, double* up) {
    const int32_t nl = Count(lower), nu = Count(upper);
    if (nl != nu || (nl != 0 && nl < p)) return SizeMismatchErr;
    if (nl == 0) {
        for (int32_t j = 0; j < p; ++j) lo[j] = -kInf, up[j] = kInf;
        return 0;
    }
    const double *l = nullptr, *u = nullptr;
    Status s = f.In(lower, &l);
    if (s == 0) s = f.In(upper, &u);
    if (s != 0) return s;
    for (int32_t j = 0; j < p; ++j) {
        if (std::isnan(l[j]) || std::isnan(u[j])) return BoundsNanErr;
        lo[j] = l[j], up[j] = u[j];
    }
    for (int32_t j = 0; j < p; ++j)
        if (lo[j] > up[j]) return BoundsOrderErr;
    return 0;
}

// Non-convergence leaves the outputs standing: the frame commits them and the status goes back.
Status FinishStanding(Frame& f, Status s, bool warn) {
    const bool standing = s == NoConvergenceErr;
    Status r = f.Finish(standing ? 0 : s);
    if (r == 0 && standing) r = NoConvergenceErr;
    return r == 0 && warn ? InitialLengthWarn : r;
}

enum class Which { Exp, Power, Gauss, Log };

Status ModelFrame(Which which, Handle& y, Handle x, Handle w, double tol, int32_t* iterations,
                  Handle guessHandle, Handle lower, Handle upper, uint16_t kind, double base,
                  double* const* outs, double* mse) {
    const int32_t p = which == Which::Gauss ? 4 : which == Which::Log ? 2 : 3;
    Frame f;
    for (int32_t j = 0; j < p; ++j) f.Result(outs[j]);
    f.Result(mse);
    f.Output<double>(y);
    const int32_t n = Count(y);
    const double *xs = nullptr, *ws = nullptr, *guess = nullptr;
    double* ys = nullptr;
    double lo[4], up[4], q[4] = {0, 0, 0, 0}, e = 0;
    Status s = ReadSamples(f, x, w, n, &xs, &ws);
    if (s == 0) s = ReadBounds(f, lower, upper, p, lo, up);
    const int32_t ng = Count(guessHandle);
    const bool warn = ng != 0 && ng != p;
    // The logarithm takes its start from a plain fit and only tests the guess's length.
    if (s == 0 && ng >= p && which != Which::Log) s = f.In(guessHandle, &guess);
    if (s == 0) s = f.InPlace(y, &ys);
    const int32_t limit = iterations != nullptr ? *iterations : 0;
    if (s == 0) {
        if (which == Which::Log)
            s = BoundedLogFit(xs, ys, ws, n, tol, limit, lo, up, kind, base, q, ys, &e);
        else
            s = BoundedModelFit(which == Which::Exp     ? BoundModel::Exp
                                : which == Which::Power ? BoundModel::Power
                                                        : BoundModel::Gauss,
                                xs, ys, ws, n, tol, limit, guess, lo, up, kind, q, ys, &e);
    }
    if (s >= 0 || s == NoConvergenceErr) {
        for (int32_t j = 0; j < p; ++j)
            if (outs[j] != nullptr) *outs[j] = q[j];
        if (mse != nullptr) *mse = e;
        if (n == 0 && iterations != nullptr) *iterations = 0;
    }
    return FinishStanding(f, s, warn);
}

Status LineFrame(int kind, Handle& y, Handle x, Handle w, double tol, int32_t* iterations, Handle lower,
                 Handle upper, double* slope, double* intercept, double* err) {
    Frame f;
    f.Result(slope);
    f.Result(intercept);
    f.Result(err);
    f.Output<double>(y);
    const int32_t n = Count(y);
    const double *xs = nullptr, *ws = nullptr;
    double* ys = nullptr;
    LineBounds b{};
    Status s = ReadSamples(f, x, w, n, &xs, &ws);
    if (s == 0) s = ReadBounds(f, lower, upper, 2, b.lower, b.upper);
    if (s == 0) s = f.InPlace(y, &ys);
    const int32_t limit = iterations != nullptr ? *iterations : 0;
    int32_t count = 0;
    if (s == 0 && kind == 0) s = BoundedLine(xs, ys, ws, n, b, slope, intercept, ys, err);
    if (s == 0 && kind == 1)
        s = BisquareLine(xs, ys, ws, n, tol, limit, slope, intercept, ys, err, &count, &b);
    if (s == 0 && kind == 2)
        s = LarLine(xs, ys, ws, n, tol, -1.0, limit, slope, intercept, ys, err, &count, &b);
    if (s >= 0 && n == 0 && iterations != nullptr) *iterations = 0;
    return f.Finish(s);
}

}  // namespace

TW_API int32_t BoundExpFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                int32_t* iterations, Array1DHandle guess, Array1DHandle lower,
                                Array1DHandle upper, uint16_t errorKind, double* a, double* b, double* c,
                                double* mse) {
    double* const outs[3] = {a, b, c};
    return ModelFrame(Which::Exp, y, x, weights, tolerance, iterations, guess, lower, upper, errorKind, 0,
                      outs, mse);
}

TW_API int32_t BoundPowerFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                  int32_t* iterations, Array1DHandle guess, Array1DHandle lower,
                                  Array1DHandle upper, uint16_t errorKind, double* a, double* b, double* c,
                                  double* mse) {
    double* const outs[3] = {a, b, c};
    return ModelFrame(Which::Power, y, x, weights, tolerance, iterations, guess, lower, upper, errorKind, 0,
                      outs, mse);
}

TW_API int32_t BoundGaussianFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights,
                                     double tolerance, int32_t* iterations, Array1DHandle guess,
                                     Array1DHandle lower, Array1DHandle upper, uint16_t errorKind,
                                     double* amplitude, double* centre, double* deviation, double* offset,
                                     double* mse) {
    double* const outs[4] = {amplitude, centre, deviation, offset};
    return ModelFrame(Which::Gauss, y, x, weights, tolerance, iterations, guess, lower, upper, errorKind, 0,
                      outs, mse);
}

TW_API int32_t BoundLogFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                int32_t* iterations, Array1DHandle guess, Array1DHandle lower,
                                Array1DHandle upper, uint16_t errorKind, double base, double* a, double* b,
                                double* mse) {
    double* const outs[2] = {a, b};
    return ModelFrame(Which::Log, y, x, weights, tolerance, iterations, guess, lower, upper, errorKind, base,
                      outs, mse);
}

TW_API int32_t BoundLinearFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights,
                                   Array1DHandle lower, Array1DHandle upper, double* slope, double* intercept,
                                   double* mse) {
    return LineFrame(0, y, x, weights, 0, nullptr, lower, upper, slope, intercept, mse);
}

TW_API int32_t BoundLinearFitBi_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights,
                                     double tolerance, int32_t* iterations, Array1DHandle lower,
                                     Array1DHandle upper, double* slope, double* intercept, double* mse) {
    return LineFrame(1, y, x, weights, tolerance, iterations, lower, upper, slope, intercept, mse);
}

TW_API int32_t BoundLinearFitLAR_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights,
                                      double tolerance, int32_t* iterations, Array1DHandle lower,
                                      Array1DHandle upper, double* slope, double* intercept, double* mae) {
    return LineFrame(2, y, x, weights, tolerance, iterations, lower, upper, slope, intercept, mae);
}

TW_API int32_t GetNewCoef_head(Array1DHandle coefficients, Array2DHandle alpha, Array1DHandle beta,
                               double* lambda, int32_t* status) {
    Frame f;
    double* c = nullptr;
    const double *a = nullptr, *b = nullptr;
    const int32_t k = Count(coefficients);
    const Shape d = Dims(alpha);
    f.Output<double>(coefficients);
    Status s = k < 1 || d.rows != k || d.cols != k || Count(beta) != k ? EmptyArrayErr : 0;
    if (s == 0) s = f.In2D(alpha, &a);
    if (s == 0) s = f.In(beta, &b);
    if (s == 0) s = f.InPlace(coefficients, &c);
    if (s == 0) s = DampedStep(c, a, b, k, lambda != nullptr ? *lambda : 0.0);
    // Stored through the pointer and returned as well.
    s = f.Finish(s);
    if (status != nullptr) *status = s;
    return s;
}
