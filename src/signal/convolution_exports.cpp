#include <algorithm>
#include <cstdint>
#include <type_traits>

#include "frame/frame.hpp"
#include "frame/status_styles.hpp"
#include "signal/convolve.hpp"
#include "twanlys/signal.h"

namespace {

using tw::cdouble;
using tw::Frame;
using tw::Handle;
using tw::Status;

constexpr int32_t kDeconvolutionLimit = 8388608;

// Resize failures of this family are reported as OutOfMemoryErr.
template <class T>
Status ResizeOut(Frame& f, Handle& h, int64_t n, T** data) {
    if (n > INT32_MAX) return OutOfMemoryErr;
    return f.Resize(h, static_cast<int32_t>(n), data) == 0 ? 0 : OutOfMemoryErr;
}

bool SameBlock(Handle a, Handle b) { return a == b || (a != nullptr && b != nullptr && *a == *b); }

// Real convolution (correlate false) or correlation. Any algorithm other than 0 and 1 computes
// nothing and succeeds, with z as the resize left it and the normalization unread.
Status RealConvolution(Handle x, Handle y, Handle& z, int32_t algorithm, bool correlate,
                       int32_t normalization) {
    Frame f;
    f.Output<double>(z);
    const int32_t nx = tw::Count(x), ny = tw::Count(y);
    Status s = nx < 1 || ny < 1 ? EmptyArrayErr : 0;
    double* out = nullptr;
    if (s == 0) s = ResizeOut(f, z, int64_t{nx} + ny - 1, &out);
    if (s != 0 || (algorithm != 0 && algorithm != 1)) return f.Finish(s);
    const bool autoCorrelation = correlate && SameBlock(x, y);
    const double *xs = nullptr, *ys = nullptr;
    s = f.In(x, &xs);
    if (s == 0) s = f.In(y, &ys);
    if (s == 0) {
        if (algorithm == 0 && !correlate)
            tw::ConvolveDirect(xs, nx, ys, ny, out);
        else if (algorithm == 0)
            tw::CorrelateDirect(xs, nx, ys, ny, out);
        else if (!correlate)
            s = tw::ConvolveFrequency(xs, nx, ys, ny, out);
        else
            s = autoCorrelation ? tw::AutoCorrelateFrequency(xs, nx, out)
                                : tw::CorrelateFrequency(xs, nx, ys, ny, out);
    }
    if (s == 0 && correlate) s = tw::NormalizeCorrelation(out, nx, ny, normalization);
    return f.Finish(s);
}

// x is replaced by its 2n - 1 auto-correlation lags; the work runs on a private copy.
Status AutoCorrelationInPlace(Handle& x, int32_t normalization) {
    Frame f;
    f.Output<double>(x);
    const int32_t n = tw::Count(x);
    Status s = n < 1 ? EmptyArrayErr : 0;
    tw::Scratch<double> copy;
    const double* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = copy.Allocate(static_cast<size_t>(n));
    if (s == 0) std::copy(xs, xs + n, copy.get());
    double* out = nullptr;
    if (s == 0) s = ResizeOut(f, x, 2 * int64_t{n} - 1, &out);
    if (s == 0) s = tw::AutoCorrelateFrequency(copy.get(), n, out);
    if (s == 0) s = tw::NormalizeCorrelation(out, n, n, normalization);
    return f.Finish(tw::MergeRelease(s, copy.Release()));
}

Status ComplexConvolution(Handle x, Handle y, Handle& z, int32_t algorithm, int32_t correlate,
                          int32_t normalization) {
    Frame f;
    f.Output<cdouble>(z);
    const int32_t nx = tw::Count(x), ny = tw::Count(y);
    Status s = nx < 1 || ny < 1                           ? EmptyArrayErr
               : (algorithm != 0 && algorithm != 1)       ? InvalidSelectorErr
               : (normalization < 0 || normalization > 2) ? InvalidSelectorErr
                                                          : 0;
    cdouble* out = nullptr;
    if (s == 0) s = ResizeOut(f, z, int64_t{nx} + ny - 1, &out);
    const cdouble *xs = nullptr, *ys = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = f.In(y, &ys);
    tw::Scratch<cdouble> reversed;
    if (s == 0 && correlate != 0) {
        s = reversed.Allocate(static_cast<size_t>(nx));
        for (int32_t i = 0; s == 0 && i < nx; ++i)
            reversed[static_cast<size_t>(i)] = std::conj(xs[nx - 1 - i]);
        xs = reversed.get();
    }
    if (s == 0) {
        if (algorithm == 0)
            tw::CxConvolveDirect(xs, nx, ys, ny, out);
        else
            s = tw::CxConvolveFrequency(xs, nx, ys, ny, out);
    }
    if (s == 0 && correlate != 0) s = tw::NormalizeCorrelation(out, nx, ny, normalization);
    return f.Finish(tw::MergeRelease(s, reversed.Release()));
}

Status DeconvolutionInPlace(Handle& x, Handle y) {
    Frame f;
    f.Output<double>(x);
    const int32_t nx = tw::Count(x), ny = tw::Count(y);
    Status s = nx > kDeconvolutionLimit || ny > kDeconvolutionLimit ? DivisorLeadingZeroErr
               : nx < 1 || ny < 1                                   ? EmptyArrayErr
               : ny > nx                                            ? SizeMismatchErr
                                                                    : 0;
    const double *xs = nullptr, *ys = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = f.In(y, &ys);
    if (s == 0 && std::all_of(ys, ys + ny, [](double v) { return v == 0.0; })) s = DivisorLeadingZeroErr;
    const int32_t nq = nx - ny + 1;
    tw::Scratch<double> q;
    if (s == 0) s = q.Allocate(static_cast<size_t>(nq));
    if (s == 0) s = tw::Deconvolve(xs, nx, ys, ny, q.get());
    double* out = nullptr;
    if (s == 0) s = ResizeOut(f, x, nq, &out);
    if (s == 0) std::copy(q.get(), q.get() + nq, out);
    return f.Finish(tw::MergeRelease(s, q.Release()));
}

// 2-D convolution (reverse false) or correlation: x reversed along both dimensions, and
// conjugated for complex data, convolved with y. sizeMode 1 and 2 cut the full result, which is
// then held in a scratch.
template <class T>
Status TwoD(Handle x, Handle y, Handle& z, int32_t sizeMode, int32_t algorithm, bool reverse) {
    constexpr bool kComplex = std::is_same_v<T, cdouble>;
    Frame f;
    f.Output2D<T>(z);
    const tw::Shape a = tw::Dims(x), b = tw::Dims(y);
    const bool yLarger = b.rows > a.rows || b.cols > a.cols;
    Status s = tw::Elements(a) < 1 || tw::Elements(b) < 1                          ? EmptyArrayErr
               : sizeMode < 0 || sizeMode > 2                                      ? InvalidSelectorErr
               : algorithm != 0 && algorithm != 1                                  ? InvalidSelectorErr
               : sizeMode == 2 && yLarger                                          ? SizeMismatchErr
               : kComplex && sizeMode == 2 && (a.rows < a.cols || b.rows < b.cols) ? SizeMismatchErr
                                                                                   : 0;
    const int32_t fullRows = a.rows + b.rows - 1, fullCols = a.cols + b.cols - 1;
    tw::Shape out = {fullRows, fullCols}, origin = {0, 0};
    if (sizeMode == 1) out = a, origin = {b.rows / 2, b.cols / 2};
    if (sizeMode == 2) out = {a.rows - b.rows + 1, a.cols - b.cols + 1}, origin = {b.rows - 1, b.cols - 1};
    T* zs = nullptr;
    if (s == 0) s = f.Resize2D(z, out.rows, out.cols, &zs) == 0 ? 0 : OutOfMemoryErr;
    const T *xs = nullptr, *ys = nullptr;
    if (s == 0) s = f.In2D(x, &xs);
    if (s == 0) s = f.In2D(y, &ys);
    tw::Scratch<T> reversed, full;
    if (s == 0 && reverse) {
        const size_t n = static_cast<size_t>(tw::Elements(a));
        s = reversed.Allocate(n);
        for (size_t i = 0; s == 0 && i < n; ++i) {
            if constexpr (kComplex)
                reversed[i] = std::conj(xs[n - 1 - i]);
            else
                reversed[i] = xs[n - 1 - i];
        }
        xs = reversed.get();
    }
    T* target = zs;
    if (s == 0 && sizeMode != 0) {
        s = full.Allocate(static_cast<size_t>(fullRows) * static_cast<size_t>(fullCols));
        target = full.get();
    }
    if (s == 0) {
        if (algorithm == 0)
            tw::Convolve2DDirect(xs, a.rows, a.cols, ys, b.rows, b.cols, target);
        else
            s = tw::Convolve2DFrequency(xs, a.rows, a.cols, ys, b.rows, b.cols, target);
    }
    if (s == 0 && sizeMode != 0) {
        for (int32_t r = 0; r < out.rows; ++r) {
            const T* from =
                target + static_cast<size_t>(origin.rows + r) * static_cast<size_t>(fullCols) + origin.cols;
            std::copy(from, from + out.cols, zs + static_cast<size_t>(r) * static_cast<size_t>(out.cols));
        }
    }
    s = tw::MergeRelease(s, full.Release());
    return f.Finish(tw::MergeRelease(s, reversed.Release()));
}

}  // namespace

TW_API int32_t Convolution(Array1DHandle x, Array1DHandle y, Array1DHandle z, int32_t* algorithm,
                           int32_t* status) {
    return tw::ToPointer(status, RealConvolution(x, y, z, algorithm != nullptr ? *algorithm : 0, false, 0));
}

TW_API int32_t Rxy80(Array1DHandle x, Array1DHandle y, Array1DHandle z, int32_t* algorithm,
                     int32_t normalization, int32_t* status) {
    return tw::ToPointer(
        status, RealConvolution(x, y, z, algorithm != nullptr ? *algorithm : 0, true, normalization));
}

TW_API int32_t Rxy(Array1DHandle x, Array1DHandle y, Array1DHandle z, int32_t* algorithm, int32_t* status) {
    return Rxy80(x, y, z, algorithm, 0, status);
}

TW_API int32_t AutoCorrelation80(Array1DHandle x, int32_t normalization, int32_t* status) {
    return tw::ToPointer(status, AutoCorrelationInPlace(x, normalization));
}

TW_API int32_t AutoCorrelation(Array1DHandle x, int32_t* status) { return AutoCorrelation80(x, 0, status); }

TW_API int32_t CxConvolution(Array1DHandle x, Array1DHandle y, Array1DHandle z, int32_t algorithm,
                             int32_t correlate, int32_t normalization) {
    return ComplexConvolution(x, y, z, algorithm, correlate, normalization);
}

TW_API int32_t Deconvolution(Array1DHandle x, Array1DHandle y, int32_t* status) {
    const Status s = DeconvolutionInPlace(x, y);
    if (status != nullptr) *status = s;
    return s;
}

TW_API int32_t Convolve_2DH(Array2DHandle x, Array2DHandle y, Array2DHandle z, int32_t sizeMode,
                            int32_t algorithm) {
    return TwoD<double>(x, y, z, sizeMode, algorithm, false);
}

TW_API int32_t CxConvolve_2DH(Array2DHandle x, Array2DHandle y, Array2DHandle z, int32_t sizeMode,
                              int32_t algorithm) {
    return TwoD<cdouble>(x, y, z, sizeMode, algorithm, false);
}

TW_API int32_t Correlation_2DH(Array2DHandle x, Array2DHandle y, Array2DHandle z, int32_t algorithm) {
    return TwoD<double>(x, y, z, 0, algorithm, true);
}

TW_API int32_t CxCorrelation_2DH(Array2DHandle x, Array2DHandle y, Array2DHandle z, int32_t algorithm) {
    return TwoD<cdouble>(x, y, z, 0, algorithm, true);
}
