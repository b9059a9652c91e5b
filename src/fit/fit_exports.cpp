#include <cstring>

#include "fit/fit_core.hpp"
#include "fit/fit_frame.hpp"
#include "frame/frame.hpp"
#include "twanlys/fit.h"

using namespace tw;

namespace {

// Standard deviations s turned into weights 1 / (s s), s = 0 into 1.
Status WeightsFromDeviations(const double* sd, int32_t n, Scratch<double>* w) {
    if (sd == nullptr) return 0;
    if (const Status s = w->Allocate(static_cast<size_t>(n))) return s;
    for (int32_t i = 0; i < n; ++i) (*w)[i] = sd[i] == 0 ? 1.0 : 1 / (sd[i] * sd[i]);
    return 0;
}

// A guess of p parameters: none when empty or shorter, its first p when longer; *warn when the
// length is neither 0 nor p.
Status ReadGuess(Frame& f, Handle g, int32_t p, const double** guess, bool* warn) {
    const int32_t n = Count(g);
    *guess = nullptr;
    *warn = n != 0 && n != p;
    return n >= p ? f.In(g, guess) : 0;
}

// y as input, or as input and best-fit output (written back on success, shrunk on failure).

Status WithWarning(Status s, bool warn) { return s == 0 && warn ? InitialLengthWarn : s; }

void SetNaN(double* a, double* b, double* c) {
    for (double* p : {a, b, c})
        if (p != nullptr) *p = kNaN;
}

Status LineFrame(Handle& y, Handle x, Handle w, double* slope, double* intercept, double* mse, bool bestFit) {
    Frame f;
    f.Result(slope);
    f.Result(intercept);
    f.Result(mse);
    if (bestFit) f.Output<double>(y);
    const int32_t n = Count(y);
    double* fit = nullptr;
    const double *xs = nullptr, *ws = nullptr, *ys = nullptr;
    // Length mismatch is reported before anything else.
    Status s = ReadSamples(f, x, w, n, &xs, &ws);
    if (s == 0) s = ViewY(f, y, bestFit, &ys, &fit);
    if (s == 0) s = LineFit(xs, ys, ws, n, slope, intercept, fit, mse);
    return f.Finish(s);
}

Status PolyFrame(Handle x, Handle y, int32_t order, Handle w, int32_t method, Handle powers, Handle values,
                 Handle& bestFit, Handle& coef, double* mse) {
    Frame f;
    f.Output<double>(bestFit);
    f.Output<double>(coef);
    f.Result(mse);
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
    if (s == 0 && (f.Resize(bestFit, n, &fit) != 0 || f.Resize(coef, order + 1, &c) != 0)) s = OutOfMemoryErr;
    if (s == 0)
        s = PolyFitCore(xs, ys, ws, n, order, method, {ps, vs, fixed}, PolyLeastSquares, kPlainTuning, c, fit, mse);
    return f.Finish(s);
}

Status GenLSFrame(Handle h, Handle y, Handle third, int32_t method, int32_t wantCov, Handle& coef, Handle& bestFit,
                  Handle& covariance, double* mse, bool deviations) {
    Frame f(deviations ? FailOn::Negative : FailOn::NonZero);
    f.Output<double>(coef);
    f.Output<double>(bestFit);
    f.Output2D<double>(covariance);
    f.Result(mse);
    const Shape d = Dims(h);
    const int32_t n = d.rows, k = d.cols, nw = Count(third);
    const double *hs = nullptr, *ys = nullptr, *ws = nullptr;
    double *c = nullptr, *fit = nullptr, *cov = nullptr;
    Scratch<double> weights;
    Status s = Count(y) != n || (nw != 0 && nw < n) ? EqSamplesErr : 0;
    if (s == 0) s = f.In2D(h, &hs);
    if (s == 0) s = f.In(y, &ys);
    if (s == 0 && nw != 0) s = f.In(third, &ws);
    if (s == 0 && deviations && ws != nullptr) {
        s = WeightsFromDeviations(ws, n, &weights);
        ws = weights.get();
    }
    const int32_t kc = wantCov != 0 ? k : 0;
    if (s == 0 && (f.Resize(coef, k, &c) != 0 || f.Resize(bestFit, n, &fit) != 0 ||
                   f.Resize2D(covariance, kc, kc, &cov) != 0))
        s = OutOfMemoryErr;
    if (s == 0)
        s = GeneralLeastSquares(hs, n, k, ys, ws, static_cast<uint32_t>(method), c, wantCov != 0 ? cov : nullptr,
                                fit, mse);
    return f.Finish(MergeRelease(s, weights.Release()));
}

// The exponential and power exports with a best fit in y (bestFit) or coefficients only.
Status TwoParamFrame(bool power, Handle& y, Handle x, Handle w, int32_t method, double tol, Handle guessHandle,
                     double* a, double* b, double* mse, int32_t* iterations, double floor, bool bestFit) {
    Frame f;
    f.Result(a);
    f.Result(b);
    f.Result(mse);
    const int32_t n = Count(y);
    double* fit = nullptr;
    const double *xs = nullptr, *ws = nullptr, *ys = nullptr, *guess = nullptr;
    bool warn = false;
    if (bestFit) f.Output<double>(y);
    Status s = ReadSamples(f, x, w, n, &xs, &ws);
    if (s == 0) s = ReadGuess(f, guessHandle, 2, &guess, &warn);
    if (s == 0) s = ViewY(f, y, bestFit, &ys, &fit);
    const IterationInputs it{tol, floor, iterations};
    if (s == 0)
        s = power ? PowerFitCore(xs, ys, ws, n, guess, it, a, b, fit, mse)
                  : ExpFitCore(xs, ys, ws, n, method, guess, it, a, b, fit, mse);
    return f.Finish(WithWarning(s, warn));
}

Status LogFrame(Handle& y, Handle x, Handle w, double base, double* a, double* b, double* mse, bool bestFit) {
    Frame f;
    f.Result(a);
    f.Result(b);
    f.Result(mse);
    const int32_t n = Count(y);
    double* fit = nullptr;
    const double *xs = nullptr, *ws = nullptr, *ys = nullptr;
    if (bestFit) f.Output<double>(y);
    // The coefficients-only export tests the base before the lengths.
    Status s = !bestFit && !(base > 0) ? BadDataRangeErr : ReadSamples(f, x, w, n, &xs, &ws);
    if (s == 0) s = ViewY(f, y, bestFit, &ys, &fit);
    if (s == 0) s = LogFitCore(xs, ys, ws, n, base, a, b, fit, mse);
    return f.Finish(s);
}

Status GaussFrame(Handle& y, Handle x, Handle w, double tol, Handle guessHandle, double* a, double* c, double* sd,
                  double* mse, int32_t* iterations, double floor, bool bestFit) {
    Frame f;
    f.Result(a);
    f.Result(c);
    f.Result(sd);
    f.Result(mse);
    const int32_t n = Count(y);
    double* fit = nullptr;
    const double *xs = nullptr, *ws = nullptr, *ys = nullptr, *guess = nullptr;
    bool warn = false;
    if (bestFit) f.Output<double>(y);
    Status s = ReadSamples(f, x, w, n, &xs, &ws);
    if (s == 0) s = ReadGuess(f, guessHandle, 3, &guess, &warn);
    if (s == 0) s = ViewY(f, y, bestFit, &ys, &fit);
    if (s == 0) s = GaussianPeakFitCore(xs, ys, ws, n, guess, {tol, floor, iterations}, a, c, sd, fit, mse);
    return f.Finish(WithWarning(s, warn));
}

}  // namespace

TW_API int32_t LinFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double* slope,
                           double* intercept, double* mse) {
    return LineFrame(y, x, weights, slope, intercept, mse, true);
}

TW_API int32_t LinFitCoef_head(Array1DHandle y, Array1DHandle x, double* slope, double* intercept,
                               int32_t* status) {
    return ToPointer(status, LineFrame(y, x, nullptr, slope, intercept, nullptr, false));
}

TW_API int32_t LinFitCoef80_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double* slope,
                                 double* intercept, int32_t* status) {
    return ToPointer(status, LineFrame(y, x, weights, slope, intercept, nullptr, false));
}

TW_API int32_t PolyFit_head(Array1DHandle x, Array1DHandle y, int32_t order, int32_t method, Array1DHandle bestFit,
                            Array1DHandle coefficients, double* mse) {
    return PolyFrame(x, y, order, nullptr, method, nullptr, nullptr, bestFit, coefficients, mse);
}

TW_API int32_t PolyFit80_head(Array1DHandle x, Array1DHandle y, int32_t order, int32_t method,
                              Array1DHandle fixedPowers, Array1DHandle fixedValues, Array1DHandle bestFit,
                              Array1DHandle coefficients, double* mse) {
    return PolyFrame(x, y, order, nullptr, method, fixedPowers, fixedValues, bestFit, coefficients, mse);
}

TW_API int32_t PolyFit81_head(Array1DHandle x, Array1DHandle y, int32_t order, Array1DHandle weights,
                              int32_t method, Array1DHandle fixedPowers, Array1DHandle fixedValues,
                              Array1DHandle bestFit, Array1DHandle coefficients, double* mse) {
    return PolyFrame(x, y, order, weights, method, fixedPowers, fixedValues, bestFit, coefficients, mse);
}

TW_API int32_t GenLSFit_head(Array2DHandle h, Array1DHandle y, Array1DHandle deviations, int32_t method,
                             int32_t covarianceWanted, Array1DHandle coefficients, Array1DHandle bestFit,
                             Array2DHandle covariance, double* mse) {
    return GenLSFrame(h, y, deviations, method, covarianceWanted, coefficients, bestFit, covariance, mse, true);
}

TW_API int32_t GenLSFit80_head(Array2DHandle h, Array1DHandle y, Array1DHandle weights, int32_t method,
                               int32_t covarianceWanted, Array1DHandle coefficients, Array1DHandle bestFit,
                               Array2DHandle covariance, double* mse) {
    return GenLSFrame(h, y, weights, method, covarianceWanted, coefficients, bestFit, covariance, mse, false);
}

TW_API int32_t GoodnessOfFit_head(Array1DHandle y, Array1DHandle fitted, Array1DHandle weights, int32_t dof,
                                  double* sse, double* rSquared, double* rmse) {
    Frame f;
    f.Result(sse);
    f.Result(rSquared);
    f.Result(rmse);
    const int32_t n = Count(y), nw = Count(weights);
    const double *ys = nullptr, *fs = nullptr, *ws = nullptr;
    Status s = n < 1 ? EmptyArrayErr : Count(fitted) != n || (nw != 0 && nw != n) ? EqSamplesErr : 0;
    if (s == 0) s = f.In(y, &ys);
    if (s == 0) s = f.In(fitted, &fs);
    if (s == 0 && nw != 0) s = f.In(weights, &ws);
    if (s == 0) s = GoodnessOfFitCore(ys, fs, ws, n, dof, sse, rSquared, rmse);
    return f.Finish(s);
}

TW_API int32_t ExpFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle deviations, double* a, double* b,
                           double* mse) {
    Frame f;
    f.Result(a);
    f.Result(b);
    f.Result(mse);
    f.Output<double>(y);
    const int32_t n = Count(y);
    double* fit = nullptr;
    const double *xs = nullptr, *sd = nullptr, *ys = nullptr;
    Scratch<double> weights;
    Status s = ReadSamples(f, x, deviations, n, &xs, &sd);
    if (s == 0) s = WeightsFromDeviations(sd, n, &weights);
    if (s == 0) s = ViewY(f, y, true, &ys, &fit);
    int32_t iterations = 0;
    if (s == 0) s = ExpFitCore(xs, ys, weights.get(), n, 0, nullptr, {-1.0, 1e-10, &iterations}, a, b, fit, mse);
    return f.Finish(MergeRelease(s, weights.Release()));
}

TW_API int32_t ExpFitCoef_head(Array1DHandle y, Array1DHandle x, double* a, double* b) {
    int32_t iterations = 1;
    return TwoParamFrame(false, y, x, nullptr, 0, -1.0, nullptr, a, b, nullptr, &iterations, 1e-10, false);
}

TW_API int32_t ExpFit80_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                             Array1DHandle guess, uint16_t method, double* a, double* b, double* mse,
                             int32_t* iterations, double floor) {
    SetNaN(a, b, mse);
    return TwoParamFrame(false, y, x, weights, method, tolerance, guess, a, b, mse, iterations, floor, true);
}

TW_API int32_t ExpFitCoef80_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, int32_t method,
                                 double tolerance, Array1DHandle guess, double* a, double* b, int32_t* iterations,
                                 double floor) {
    return TwoParamFrame(false, y, x, weights, method, tolerance, guess, a, b, nullptr, iterations, floor, false);
}

TW_API int32_t PowerFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                             Array1DHandle guess, double* a, double* b, double* mse, int32_t* iterations,
                             double floor) {
    SetNaN(a, b, mse);
    return TwoParamFrame(true, y, x, weights, 1, tolerance, guess, a, b, mse, iterations, floor, true);
}

TW_API int32_t PowerFitCoef_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                 Array1DHandle guess, double* a, double* b, int32_t* iterations, double floor) {
    return TwoParamFrame(true, y, x, weights, 1, tolerance, guess, a, b, nullptr, iterations, floor, false);
}

TW_API int32_t LogFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double* a,
                           double* b, double* mse) {
    return LogFrame(y, x, weights, base, a, b, mse, true);
}

TW_API int32_t LogFitCoef_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double* a,
                               double* b) {
    return LogFrame(y, x, weights, base, a, b, nullptr, false);
}

TW_API int32_t GaussianPeakFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                    Array1DHandle guess, double* amplitude, double* centre, double* deviation,
                                    double* mse, int32_t* iterations, double floor) {
    return GaussFrame(y, x, weights, tolerance, guess, amplitude, centre, deviation, mse, iterations, floor, true);
}

TW_API int32_t GaussianPeakFitCoef_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                        Array1DHandle guess, double* amplitude, double* centre, double* deviation,
                                        int32_t* iterations, double floor) {
    return GaussFrame(y, x, weights, tolerance, guess, amplitude, centre, deviation, nullptr, iterations, floor,
                      false);
}
