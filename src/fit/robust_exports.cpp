#include <cstring>

#include "fit/fit_core.hpp"
#include "fit/robust.hpp"
#include "fit/fit_frame.hpp"
#include "frame/frame.hpp"
#include "twanlys/fit.h"

using namespace tw;

namespace {

int32_t Limit(const int32_t* iterations) { return iterations != nullptr ? *iterations : 0; }

// Whether the fixed terms name every power 0 .. order.
bool AllFixed(const int32_t* powers, int32_t count, int32_t order) {
    Scratch<uint8_t> seen;
    if (count < order + 1 || seen.Allocate(static_cast<size_t>(order) + 1) != 0) return false;
    std::memset(seen.get(), 0, static_cast<size_t>(order) + 1);
    int32_t named = 0;
    for (int32_t j = 0; j < count; ++j)
        if (powers[j] >= 0 && powers[j] <= order && seen[static_cast<size_t>(powers[j])] == 0) {
            seen[static_cast<size_t>(powers[j])] = 1;
            ++named;
        }
    return named == order + 1;
}

Status LineFrame(bool lar, Handle& y, Handle x, Handle w, double tol, double* slope, double* intercept,
                 double* err, int32_t* iterations, double floor, int32_t coefOnly) {
    Frame f;
    f.Result(slope);
    f.Result(intercept);
    if (coefOnly == 0) {
        f.Result(err);
        f.Output<double>(y);
    }
    const int32_t n = Count(y);
    const double *xs = nullptr, *ws = nullptr, *ys = nullptr;
    double* fit = nullptr;
    Status s = ReadSamples(f, x, w, n, &xs, &ws);
    if (s == 0) s = ViewY(f, y, coefOnly == 0, &ys, &fit);
    int32_t count = 0;
    double* e = coefOnly == 0 ? err : nullptr;
    if (s == 0)
        s = lar ? LarLine(xs, ys, ws, n, tol, floor, Limit(iterations), slope, intercept, fit, e, &count)
                : BisquareLine(xs, ys, ws, n, tol, Limit(iterations), slope, intercept, fit, e, &count);
    if (s >= 0 && iterations != nullptr) *iterations = count;
    return f.Finish(s);
}

Status PolyFrame(int32_t kind, Handle x, Handle y, int32_t order, Handle w, int32_t method, Handle powers,
                 Handle values, Handle& bestFit, Handle& coef, double* err, double tol, int32_t* iterations,
                 double floor, int32_t coefOnly) {
    Frame f;
    f.Output<double>(coef);
    if (coefOnly == 0) {
        f.Output<double>(bestFit);
        f.Result(err);
    }
    const int32_t n = Count(y), fixed = Count(powers);
    const double *xs = nullptr, *ys = nullptr, *ws = nullptr, *vs = nullptr;
    const int32_t* ps = nullptr;
    double *fit = nullptr, *c = nullptr;
    Status s = ReadSamples(f, x, w, n, &xs, &ws);
    if (s == 0 && Count(values) != fixed) s = EqSamplesErr;
    if (s == 0 && order < 0) s = NegativeOrderErr;
    if (s == 0 && !(order - fixed < n)) s = PolyOrderErr;
    if (s == 0) s = f.In(y, &ys);
    if (s == 0 && fixed > 0) s = f.In(powers, &ps);
    if (s == 0 && fixed > 0) s = f.In(values, &vs);
    if (s == 0 && coefOnly == 0 && f.Resize(bestFit, n, &fit) != 0) s = OutOfMemoryErr;
    if (s == 0 && f.Resize(coef, order + 1, &c) != 0) s = OutOfMemoryErr;
    int32_t it = Limit(iterations);
    double mse = 0;
    if (s == 0)
        s = PolyFitCore(xs, ys, ws, n, order, method, {ps, vs, fixed}, kind, {tol, floor, 0, &it}, c, fit,
                        coefOnly == 0 ? &mse : nullptr);
    if (s >= 0 && coefOnly == 0) {
        const double* vw = nullptr;
        VetWeights(ws, n, 1, &vw);  // passed inside the core already
        *err = kind == PolyLeastAbsolute ? MeanAbsResidual(ys, fit, vw, n) : mse;
    }
    // The least-absolute-residual core reads its limit and leaves it. With every power fixed no
    // robust fit runs, and no refit is counted.
    if (s >= 0 && kind == PolyBisquare && iterations != nullptr)
        *iterations = AllFixed(ps, fixed, order) ? 0 : it;
    return f.Finish(s);
}

Status ModelFrame(RobustModel model, RobustKind kind, Handle& y, Handle x, Handle w, double tol,
                  Handle guessHandle, int32_t method, double base, double* out0, double* out1, double* out2,
                  double* err, int32_t* iterations, double floor, int32_t coefOnly) {
    Frame f;
    f.Result(out0);
    f.Result(out1);
    f.Result(out2);
    if (coefOnly == 0) {
        f.Result(err);
        f.Output<double>(y);
    }
    const int32_t n = Count(y), np = model == RobustModel::Gauss ? 3 : 2;
    const double *xs = nullptr, *ws = nullptr, *ys = nullptr, *guess = nullptr;
    double* fit = nullptr;
    Status s = ReadSamples(f, x, w, n, &xs, &ws);
    const int32_t ng = Count(guessHandle);
    const bool warn = ng != 0 && ng != np;
    if (s == 0 && ng >= np) s = f.In(guessHandle, &guess);
    if (s == 0) s = ViewY(f, y, coefOnly == 0, &ys, &fit);
    double p[3] = {0, 0, 0}, e = 0;
    int32_t count = 0;
    if (s == 0)
        s = RobustModelFit(xs, ys, ws, n, {model, kind, method, guess, base, tol, floor, Limit(iterations)},
                           p, fit, coefOnly == 0 ? &e : nullptr, &count);
    if (s >= 0) {
        double* outs[3] = {out0, out1, out2};
        for (int32_t i = 0; i < np; ++i)
            if (outs[i] != nullptr) *outs[i] = p[i];
        if (coefOnly == 0 && err != nullptr) *err = e;
        if (iterations != nullptr) *iterations = count;
        if (s == 0 && warn) s = InitialLengthWarn;
    }
    return f.Finish(s);
}

Status GeneralFrame(bool lar, Handle h, Handle y, Handle& w, bool weightsOut, int32_t method, int32_t wantCov,
                    double tol, double floor, int32_t* iterations, Handle& coef, Handle& bestFit,
                    Handle& covariance, double* err) {
    Frame f;
    f.Output<double>(coef);
    f.Output<double>(bestFit);
    f.Output2D<double>(covariance);
    f.Result(err);
    if (weightsOut) f.Output<double>(w);
    const Shape d = Dims(h);
    const int32_t n = d.rows, k = d.cols, nw = Count(w);
    const double *hs = nullptr, *ys = nullptr, *ws = nullptr;
    double *c = nullptr, *fit = nullptr, *cov = nullptr, *wio = nullptr;
    Scratch<double> robust;
    Status s = Count(y) != n || (nw != 0 && nw != n) ? EqSamplesErr : 0;
    if (s == 0) s = f.In2D(h, &hs);
    if (s == 0) s = f.In(y, &ys);
    if (s == 0 && weightsOut) {
        if (nw == 0) {
            s = f.Resize(w, n, &wio) != 0 ? OutOfMemoryErr : 0;
            if (s == 0)
                for (int32_t i = 0; i < n; ++i) wio[i] = 1.0;
        } else {
            s = f.InPlace(w, &wio);
        }
        ws = wio;
        if (s == 0 && robust.Allocate(static_cast<size_t>(n)) != 0) s = OutOfMemoryErr;
    } else if (s == 0 && nw != 0) {
        s = f.In(w, &ws);
    }
    const int32_t kc = wantCov != 0 ? k : 0;
    if (s == 0 && (f.Resize(coef, k, &c) != 0 || f.Resize(bestFit, n, &fit) != 0 ||
                   f.Resize2D(covariance, kc, kc, &cov) != 0))
        s = OutOfMemoryErr;
    const uint32_t m = static_cast<uint32_t>(method);
    double* cv = wantCov != 0 ? cov : nullptr;
    if (s == 0 && lar) {
        s = GenLarCore(hs, n, k, ys, ws, m, tol, floor, Limit(iterations), c, fit, cv, err);
    } else if (s == 0) {
        int32_t count = Limit(iterations);
        double own = 0;
        s = GenBisquareCore(hs, n, k, ys, ws, robust.get(), m, tol, &count, c, fit, cv, &own);
        if (s >= 0) {
            *err = FitMse(ys, fit, ws, n, MseWalk::Forward);
            if (iterations != nullptr) *iterations = count;
            if (weightsOut && count > 0)
                std::memcpy(wio, robust.get(), static_cast<size_t>(n) * sizeof(double));
        }
    }
    return f.Finish(MergeRelease(s, robust.Release()));
}

}  // namespace

TW_API int32_t BiLinearFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                double* slope, double* intercept, double* mse, int32_t* iterations,
                                int32_t coefficientsOnly) {
    return LineFrame(false, y, x, weights, tolerance, slope, intercept, mse, iterations, 0, coefficientsOnly);
}

TW_API int32_t LARLinearFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                 double* slope, double* intercept, double* mae, int32_t* iterations,
                                 double floor, int32_t coefficientsOnly) {
    return LineFrame(true, y, x, weights, tolerance, slope, intercept, mae, iterations, floor,
                     coefficientsOnly);
}

TW_API int32_t BiPolyFit_head(Array1DHandle x, Array1DHandle y, int32_t order, Array1DHandle weights,
                              int32_t method, Array1DHandle fixedPowers, Array1DHandle fixedValues,
                              Array1DHandle bestFit, Array1DHandle coefficients, double* mse,
                              double tolerance, int32_t* iterations, int32_t coefficientsOnly) {
    return PolyFrame(PolyBisquare, x, y, order, weights, method, fixedPowers, fixedValues, bestFit,
                     coefficients, mse, tolerance, iterations, -1.0, coefficientsOnly);
}

TW_API int32_t LARPolyFit_head(Array1DHandle x, Array1DHandle y, int32_t order, Array1DHandle weights,
                               int32_t method, Array1DHandle fixedPowers, Array1DHandle fixedValues,
                               Array1DHandle bestFit, Array1DHandle coefficients, double* mae,
                               double tolerance, int32_t* iterations, double floor,
                               int32_t coefficientsOnly) {
    return PolyFrame(PolyLeastAbsolute, x, y, order, weights, method, fixedPowers, fixedValues, bestFit,
                     coefficients, mae, tolerance, iterations, floor, coefficientsOnly);
}

TW_API int32_t BiExpFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                             Array1DHandle guess, uint16_t method, double* a, double* b, double* mse,
                             int32_t* iterations, double floor, int32_t coefficientsOnly) {
    return ModelFrame(RobustModel::Exp, RobustKind::Bisquare, y, x, weights, tolerance, guess, method, 0, a,
                      b, nullptr, mse, iterations, floor, coefficientsOnly);
}

TW_API int32_t LARExpFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                              Array1DHandle guess, uint16_t method, double* a, double* b, double* mae,
                              int32_t* iterations, double floor, int32_t coefficientsOnly) {
    return ModelFrame(RobustModel::Exp, RobustKind::Lar, y, x, weights, tolerance, guess, method, 0, a, b,
                      nullptr, mae, iterations, floor, coefficientsOnly);
}

TW_API int32_t BiPowerFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                               Array1DHandle guess, double* a, double* b, double* mse, int32_t* iterations,
                               double floor, int32_t coefficientsOnly) {
    return ModelFrame(RobustModel::Power, RobustKind::Bisquare, y, x, weights, tolerance, guess, 1, 0, a, b,
                      nullptr, mse, iterations, floor, coefficientsOnly);
}

TW_API int32_t LARPowerFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                Array1DHandle guess, double* a, double* b, double* mae, int32_t* iterations,
                                double floor, int32_t coefficientsOnly) {
    return ModelFrame(RobustModel::Power, RobustKind::Lar, y, x, weights, tolerance, guess, 1, 0, a, b,
                      nullptr, mae, iterations, floor, coefficientsOnly);
}

TW_API int32_t BiLogFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base,
                             double tolerance, double* a, double* b, double* mse, int32_t* iterations,
                             int32_t coefficientsOnly) {
    return ModelFrame(RobustModel::Log, RobustKind::Bisquare, y, x, weights, tolerance, nullptr, 0, base, a,
                      b, nullptr, mse, iterations, -1.0, coefficientsOnly);
}

TW_API int32_t LARLogFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base,
                              double tolerance, double* a, double* b, double* mae, int32_t* iterations,
                              double floor, int32_t coefficientsOnly) {
    return ModelFrame(RobustModel::Log, RobustKind::Lar, y, x, weights, tolerance, nullptr, 0, base, a, b,
                      nullptr, mae, iterations, floor, coefficientsOnly);
}

TW_API int32_t BiGaussFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                               Array1DHandle guess, double* amplitude, double* centre, double* deviation,
                               double* mse, int32_t* iterations, double floor, int32_t coefficientsOnly) {
    return ModelFrame(RobustModel::Gauss, RobustKind::Bisquare, y, x, weights, tolerance, guess, 0, 0,
                      amplitude, centre, deviation, mse, iterations, floor, coefficientsOnly);
}

TW_API int32_t LARGaussFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                Array1DHandle guess, double* amplitude, double* centre, double* deviation,
                                double* mae, int32_t* iterations, double floor, int32_t coefficientsOnly) {
    return ModelFrame(RobustModel::Gauss, RobustKind::Lar, y, x, weights, tolerance, guess, 0, 0, amplitude,
                      centre, deviation, mae, iterations, floor, coefficientsOnly);
}

TW_API int32_t GenBisquareFit_head(Array2DHandle h, Array1DHandle y, Array1DHandle weights, int32_t method,
                                   int32_t covarianceWanted, double tolerance, int32_t* iterations,
                                   Array1DHandle coefficients, Array1DHandle bestFit,
                                   Array2DHandle covariance, double* mse) {
    return GeneralFrame(false, h, y, weights, false, method, covarianceWanted, tolerance, 0, iterations,
                        coefficients, bestFit, covariance, mse);
}

TW_API int32_t GenBisquareFit_Weight_head(Array2DHandle h, Array1DHandle y, Array1DHandle weights,
                                          int32_t method, int32_t covarianceWanted, double tolerance,
                                          int32_t* iterations, Array1DHandle coefficients,
                                          Array1DHandle bestFit, Array2DHandle covariance, double* mse) {
    return GeneralFrame(false, h, y, weights, true, method, covarianceWanted, tolerance, 0, iterations,
                        coefficients, bestFit, covariance, mse);
}

TW_API int32_t GenLARFit_head(Array2DHandle h, Array1DHandle y, Array1DHandle weights, int32_t method,
                              int32_t covarianceWanted, double tolerance, double floor, int32_t* iterations,
                              Array1DHandle coefficients, Array1DHandle bestFit, Array2DHandle covariance,
                              double* mae) {
    return GeneralFrame(true, h, y, weights, false, method, covarianceWanted, tolerance, floor, iterations,
                        coefficients, bestFit, covariance, mae);
}
