#include "fit/spline.hpp"
#include "frame/frame.hpp"
#include "twanlys/fit.h"

using namespace tw;

namespace {

// y and x of one length n >= 1, the views aligned.
Status ReadTable(Frame& f, Handle y, Handle x, const double** ys, const double** xs) {
    const int32_t n = Count(y);
    if (n < 1) return EmptyArrayErr;
    if (Count(x) != n) return EqSamplesErr;
    Status s = f.In(y, ys);
    if (s == 0) s = f.In(x, xs);
    return s;
}

// An optional array of n (or, for the balance, n - 1) elements; length 0 means none.
Status ReadOptional(Frame& f, Handle h, int32_t n, const double** data) {
    *data = nullptr;
    const int32_t k = Count(h);
    if (k == 0) return 0;
    return k == n ? f.In(h, data) : EqSamplesErr;
}

using InterpCore = Status (*)(const double*, const double*, int32_t, double, double*, double*);

int32_t TableauFrame(InterpCore core, Handle y, Handle x, const double* xi, double* yi, double* dy,
                     int32_t* status) {
    Frame f;
    f.Result(yi);
    f.Result(dy);
    const double *ys = nullptr, *xs = nullptr;
    double v = 0, e = 0;
    Status s = ReadTable(f, y, x, &ys, &xs);
    if (s == 0 && xi == nullptr) s = EmptyArrayErr;
    if (s == 0) s = core(xs, ys, Count(y), *xi, &v, &e);
    if (s == 0) {
        if (yi != nullptr) *yi = v;
        if (dy != nullptr) *dy = e;
    }
    return ToPointer(status, f.Finish(s));
}

// Samples that stay are copied to the kept arrays (weights kept only when weights came in).
Status CopyKept(Frame& f, Handle& yKept, Handle& xKept, Handle& wKept, const double* ys, const double* xs,
                const double* ws, int32_t n, int32_t kept, const uint8_t* flags, Handle* removed) {
    double *yk = nullptr, *xk = nullptr, *wk = nullptr;
    int32_t* rm = nullptr;
    if (f.Resize(yKept, kept, &yk) != 0 || f.Resize(xKept, kept, &xk) != 0 ||
        f.Resize(wKept, ws != nullptr ? kept : 0, &wk) != 0 ||
        (removed != nullptr && f.Resize(*removed, n - kept, &rm) != 0))
        return OutOfMemoryErr;
    KeepSamples(ys, xs, ws, n, flags, yk, xk, wk, rm);
    return 0;
}

int32_t Zeros(const uint8_t* flags, int32_t n) {
    int32_t k = 0;
    for (int32_t i = 0; i < n; ++i) k += flags[i] == 0 ? 1 : 0;
    return k;
}

}  // namespace

TW_API int32_t Spline_head(Array1DHandle y, Array1DHandle x, double* startSlope, double* endSlope,
                           Array1DHandle y2, int32_t* status) {
    Frame f;
    f.Output<double>(y2);
    const int32_t n = Count(y);
    const double *ys = nullptr, *xs = nullptr;
    double* out = nullptr;
    Status s = ReadTable(f, y, x, &ys, &xs);
    if (s == 0 && f.Resize(y2, n, &out) != 0) s = OutOfMemoryErr;
    // A missing slope leaves its end natural.
    if (s == 0)
        s = SplineSecondDerivatives(xs, ys, n, startSlope != nullptr ? *startSlope : kNaturalEnd,
                                    endSlope != nullptr ? *endSlope : kNaturalEnd, out);
    return ToPointer(status, f.Finish(s));
}

TW_API int32_t SpInterp_head(Array1DHandle* y, Array1DHandle* x, Array1DHandle* y2, double* xi, double* yi,
                             int32_t* status) {
    Frame f;
    f.Result(yi);
    Status s = 0;
    for (Array1DHandle* h : {y, x, y2})
        if (s == 0 && (h == nullptr || Count(*h) < 1)) s = EmptyArrayErr;
    if (s == 0 && xi == nullptr) s = EmptyArrayErr;
    const int32_t n = s == 0 ? Count(*y) : 0;
    if (s == 0 && (Count(*x) != n || Count(*y2) != n)) s = EqSamplesErr;
    const double *ys = nullptr, *xs = nullptr, *y2s = nullptr;
    if (s == 0) s = f.In(*y, &ys);
    if (s == 0) s = f.In(*x, &xs);
    if (s == 0) s = f.In(*y2, &y2s);
    double v = 0;
    if (s == 0) s = SplineValue(xs, ys, y2s, n, *xi, &v);
    if (s == 0 && yi != nullptr) *yi = v;
    return ToPointer(status, f.Finish(s));
}

TW_API int32_t PolyInterp_head(Array1DHandle y, Array1DHandle x, double* xi, double* yi,
                               double* errorEstimate, int32_t* status) {
    return TableauFrame(PolyInterpCore, y, x, xi, yi, errorEstimate, status);
}

TW_API int32_t RatInterp_head(Array1DHandle y, Array1DHandle x, double* xi, double* yi, double* errorEstimate,
                              int32_t* status) {
    return TableauFrame(RatInterpCore, y, x, xi, yi, errorEstimate, status);
}

TW_API int32_t CubicSplineFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights,
                                   Array1DHandle balance, double smoothness, double* error) {
    Frame f;
    f.Output<double>(y);
    f.Result(error);
    const int32_t n = Count(y);
    const double *xs = nullptr, *ws = nullptr, *bs = nullptr;
    double* ys = nullptr;
    double e = 0;
    Status s = n < 1 ? EmptyArrayErr : Count(x) != n ? EqSamplesErr : 0;
    if (s == 0) s = ReadOptional(f, weights, n, &ws);
    if (s == 0) s = ReadOptional(f, balance, n - 1, &bs);
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = f.InPlace(y, &ys);
    if (s == 0) s = SmoothingSplineCore(xs, ys, ws, bs, n, smoothness, &e);
    if (s == 0 && error != nullptr) *error = e;
    return f.Finish(s);
}

TW_API int32_t BSplineFit_head(Array2DHandle data, Array1DHandle weights, Array1DHandle parameters,
                               int32_t degree, int32_t controlCount, uint16_t parameterisation,
                               Array2DHandle controlPoints, double* mse) {
    Frame f;
    f.Output2D<double>(data);
    f.Output2D<double>(controlPoints);
    f.Result(mse);
    const Shape d = Dims(data);
    const int32_t n = d.rows, c = d.cols, m = controlCount;
    const double *ws = nullptr, *ts = nullptr;
    double *points = nullptr, *control = nullptr;
    double e = 0;
    Status s = Elements(d) < 1 ? EmptyArrayErr : 0;
    if (s == 0) s = ReadOptional(f, weights, n, &ws);
    if (s == 0) s = ReadOptional(f, parameters, n, &ts);
    if (s == 0 && degree < 1) s = OrderNotPositiveErr;
    if (s == 0 && m <= degree) s = PolyOrderErr;
    if (s == 0 && n < 2) s = TooFewSamples2Err;
    if (s == 0 && m > n) s = PolyOrderErr;
    if (s == 0) s = f.InPlace2D(data, &points);
    if (s == 0 && f.Resize2D(controlPoints, m, c, &control) != 0) s = OutOfMemoryErr;
    if (s == 0) s = BSplineFitCore(points, n, c, ws, ts, degree, m, parameterisation, control, &e);
    if (s == 0 && mse != nullptr) *mse = e;
    return f.Finish(s);
}

TW_API int32_t RmvOutlierRng_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights,
                                  Array1DHandle range, uint16_t selector, Array1DHandle yKept,
                                  Array1DHandle xKept, Array1DHandle weightsKept, Array1DHandle removed) {
    Frame f;
    for (Handle* h : {&yKept, &xKept, &weightsKept}) f.Output<double>(*h);
    f.Output<int32_t>(removed);
    const int32_t n = Count(y), nr = Count(range);
    const double *ys = nullptr, *xs = nullptr, *ws = nullptr, *rs = nullptr;
    OutlierLimits limits{};
    Scratch<uint8_t> flags;
    Status s = n < 1 || nr < 1 ? EmptyArrayErr : 0;
    if (s == 0 && Count(x) != n) s = EqSamplesErr;
    if (s == 0) s = ReadOptional(f, weights, n, &ws);
    if (s == 0) s = f.In(range, &rs);
    if (s == 0) s = ReadOutlierLimits(rs, nr, selector, &limits);
    if (s == 0) s = f.In(y, &ys);
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = flags.Allocate(static_cast<size_t>(n));
    if (s == 0) {
        const int32_t kept = MarkOutliers(ys, xs, n, limits, flags.get());
        s = CopyKept(f, yKept, xKept, weightsKept, ys, xs, ws, n, kept, flags.get(), &removed);
    }
    return f.Finish(MergeRelease(s, flags.Release()));
}

TW_API int32_t RmvOutlierIndx_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights,
                                   Array1DHandle indices, Array1DHandle yKept, Array1DHandle xKept,
                                   Array1DHandle weightsKept, Array1DHandle mask) {
    Frame f;
    for (Handle* h : {&yKept, &xKept, &weightsKept}) f.Output<double>(*h);
    f.Output<uint8_t>(mask);
    const int32_t n = Count(y), nl = Count(indices);
    const double *ys = nullptr, *xs = nullptr, *ws = nullptr;
    const int32_t* list = nullptr;
    uint8_t* flags = nullptr;
    Status s = n < 1 || nl < 1 ? EmptyArrayErr : 0;
    if (s == 0 && Count(x) != n) s = EqSamplesErr;
    if (s == 0) s = ReadOptional(f, weights, n, &ws);
    if (s == 0) s = f.In(indices, &list);
    if (s == 0) s = f.In(y, &ys);
    if (s == 0) s = f.In(x, &xs);
    if (s == 0 && f.Resize(mask, n, &flags) != 0) s = OutOfMemoryErr;
    if (s == 0) s = MarkIndices(list, nl, n, flags);
    if (s == 0) s = CopyKept(f, yKept, xKept, weightsKept, ys, xs, ws, n, Zeros(flags, n), flags, nullptr);
    return f.Finish(s);
}
