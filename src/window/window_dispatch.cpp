#include "window/window_dispatch.hpp"

#include <cmath>

#include "window/cosine_sum.hpp"
#include "window/dolph_chebyshev.hpp"
#include "window/parametric.hpp"
#include "window/window_table.hpp"

namespace tw {
namespace {

// The windows whose constants are measured on the window itself when it is scaled.
bool MeasuredWhenScaled(int32_t number) {
    return (number >= kTriangle && number <= kWelch) || (number >= kKaiser && number <= kGaussian);
}

bool HasSymmetricForm(int32_t number) {
    return number == kRectangular || FindCosineSum(number) != nullptr ||
           (number >= kTriangle && number <= kWelch) || (number >= kKaiser && number <= kGaussian);
}

// A scratch vector of n ones (at least one element, so that n = 0 needs no special case).
Status Ones(Scratch<double>& w, int32_t n) {
    if (const Status s = w.Allocate(static_cast<size_t>(n > 0 ? n : 1))) return s;
    for (int32_t k = 0; k < n; ++k) w[k] = 1.0;
    return 0;
}

// Gaussian and Dolph-Chebyshev build their symmetric form themselves; symmetric is their flag.
template <class T>
Status Dispatch(T* x, int32_t n, int32_t number, double p, int32_t symmetric) {
    if (number == kRectangular) return 0;
    if (const CosineSumRow* row = FindCosineSum(number)) return CosineSum(x, n, row->a, row->terms, false);
    switch (number) {
        case kCosineTaper:
            return CosineTaper(x, n, p);
        case kTriangle:
            return TriangleWindow(x, n);
        case kBartlettHann:
            return BartlettHannWindow(x, n);
        case kBohman:
            return BohmanWindow(x, n);
        case kParzen:
            return ParzenWindow(x, n);
        case kWelch:
            return WelchWindow(x, n);
        case kKaiser:
            return KaiserWindow(x, n, p);
        case kDolphChebyshev:
            return DolphChebyshevWindow(x, n, p, symmetric);
        case kGaussian:
            return GaussianWindow(x, n, p, symmetric);
        case kForce:
            return ForceWindow(x, n, p);
        case kExponential:
            return ExponentialWindow(x, n, p);
        default:
            return InvalidSelectorErr;
    }
}

}  // namespace

double WindowParameter(int32_t number, double p) {
    switch (number) {
        case kCosineTaper:
            return std::isnan(p) ? 0.2 : p;
        case kKaiser:
            return std::isnan(p) ? 0.0 : p;
        case kForce:
            return std::isnan(p) ? 50.0 : p;
        case kExponential:
            return std::isnan(p) ? 0.1 : p;
        case kDolphChebyshev:
            return std::pow(10.0, (std::isnan(p) || p < 0 ? 60.0 : p) / 20);
        case kGaussian:
            return std::isnan(p) || p < 0 ? 0.2 : p;
        default:
            return 0.0;
    }
}

template <class T>
Status ApplyWindow(T* x, int32_t n, int32_t number, double p) {
    return Dispatch(x, n, number, p, 0);
}

template <class T>
Status AllWindow(T* x, int32_t n, int32_t number, double p, int32_t scaled, int32_t symmetric) {
    if (scaled != 0 && symmetric != 0) return InvalidSelectorErr;
    p = WindowParameter(number, p);
    if (scaled != 0) {
        WindowConstants constants;
        return ScaledWindow(x, n, number, p, &constants);
    }
    if (symmetric != 0) return SymmetricWindow(x, n, number, p);
    return ApplyWindow(x, n, number, p);
}

template <class T>
Status ScaledWindow(T* x, int32_t n, int32_t number, double p, WindowConstants* constants) {
    if (n < 0) return NegativeSizeErr;
    if (number == kRectangular) {
        *constants = {1, 1};
        return 0;
    }
    if (const CosineSumRow* row = FindCosineSum(number)) {
        const ConstantsRow& c = *FindTabulatedConstants(number);
        *constants = {c.enbw, c.gain};
        return n > 0 ? CosineSum(x, n, row->a, row->terms, true) : 0;
    }
    if (!MeasuredWhenScaled(number)) return InvalidSelectorErr;
    Scratch<double> w;
    Status s = Ones(w, n);
    if (s == 0) s = ApplyWindow(w.get(), n, number, p);
    if (s == 0) {
        NumericWindowConstants(w.get(), n, constants);
        if (constants->coherentGain == 0) s = WindowSumZeroErr;
    }
    if (s == 0) {
        const double inverseGain = 1 / constants->coherentGain;
        for (int32_t k = 0; k < n; ++k) x[k] = x[k] * w[k] * inverseGain;
    }
    return MergeRelease(s, w.Release());
}

// Every window but 61 and 62 is made symmetric by building it periodic at length n-1 and
// repeating its first value at the end.
template <class T>
Status SymmetricWindow(T* x, int32_t n, int32_t number, double p) {
    if (n < 1) return EmptyArrayErr;
    if (n == 1) return 0;
    if (!HasSymmetricForm(number)) return InvalidSelectorErr;
    if (number == kRectangular) return 0;
    Scratch<double> w;
    Status s = Ones(w, n);
    if (s == 0) {
        if (number == kDolphChebyshev || number == kGaussian) {
            s = Dispatch(w.get(), n, number, p, 1);
        } else {
            s = ApplyWindow(w.get(), n - 1, number, p);
            w[n - 1] = w[0];
        }
    }
    if (s == 0)
        for (int32_t k = 0; k < n; ++k) x[k] *= w[k];
    return MergeRelease(s, w.Release());
}

template <class T>
Status CosineSumByNumber(T* x, int32_t n, int32_t number, int32_t scaled) {
    static constexpr double kOne[1] = {1.0};
    if (number == kRectangular) return CosineSum(x, n, kOne, 1, scaled != 0);
    const CosineSumRow* row = FindCosineSum(number);
    if (row == nullptr) return InvalidSelectorErr;
    return CosineSum(x, n, row->a, row->terms, scaled != 0);
}

Status WindowConstantsByNumber(int32_t n, int32_t number, double p, WindowConstants* constants) {
    if (n < 1) return EmptyArrayErr;
    if (number == kRectangular || FindCosineSum(number) != nullptr) {
        const ConstantsRow& c = *FindTabulatedConstants(number);
        *constants = {c.enbw, c.gain};
        return 0;
    }
    Scratch<double> w;
    Status s = Ones(w, n);
    if (s == 0) s = ApplyWindow(w.get(), n, number, p);
    if (s == 0) NumericWindowConstants(w.get(), n, constants);
    return MergeRelease(s, w.Release());
}

void NumericWindowConstants(const double* w, int32_t n, WindowConstants* constants) {
    if (n < 1) {
        *constants = {kNaN, kNaN};
        return;
    }
    double sum = 0, squares = 0;
    for (int32_t k = 0; k < n; ++k) {
        sum += w[k];
        squares += w[k] * w[k];
    }
    *constants = {n * squares / (sum * sum), sum / n};
}

#define TW_NUMBERED_WINDOWS(T)                                                       \
    template Status ApplyWindow<T>(T*, int32_t, int32_t, double);                    \
    template Status AllWindow<T>(T*, int32_t, int32_t, double, int32_t, int32_t);    \
    template Status ScaledWindow<T>(T*, int32_t, int32_t, double, WindowConstants*); \
    template Status SymmetricWindow<T>(T*, int32_t, int32_t, double);                \
    template Status CosineSumByNumber<T>(T*, int32_t, int32_t, int32_t);
TW_NUMBERED_WINDOWS(double)
TW_NUMBERED_WINDOWS(cdouble)
#undef TW_NUMBERED_WINDOWS

}  // namespace tw
