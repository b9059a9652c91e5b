#include "window/parametric.hpp"

#include <cmath>
#include <numbers>

#include "window/cosine_sum.hpp"
#include "window/rotation.hpp"
#include "window/window_table.hpp"

namespace tw {
namespace {

constexpr double kInvPi = 0.3183098861837907;

// x[k] and its mirror x[n-k] take the same value; the middle of an even n once.
template <class T>
void MulPair(T* x, int32_t n, int32_t k, double w) {
    x[k] *= w;
    if (n - k != k) x[n - k] *= w;
}

// Windows built from k = 1 up to the middle, and zero at k = 0.
template <class T, class Value>
Status Mirrored(T* x, int32_t n, int32_t last, Value value) {
    if (n < 1) return EmptyArrayErr;
    if (n == 1) return 0;
    x[0] *= 0.0;
    for (int32_t k = 1; k <= last; ++k) MulPair(x, n, k, value(k));
    return 0;
}

// The phasor windows: value(k, cos, sin) at angle 2 pi k / n, up to and including the middle.
template <class T, class Value>
Status PhasorMirrored(T* x, int32_t n, Value value) {
    if (n < 2) return n < 1 ? EmptyArrayErr : 0;
    const Rotation r = RotationOf(1, n);
    double c = 1, s = 0;
    return Mirrored(x, n, n / 2, [&](int32_t k) {
        Rotate(c, s, r);
        return value(k, c, s);
    });
}

}  // namespace

template <class T>
Status TriangleWindow(T* x, int32_t n) {
    return Mirrored(x, n, n / 2, [n](int32_t k) { return k * (2.0 / n); });
}

template <class T>
Status BartlettHannWindow(T* x, int32_t n) {
    return PhasorMirrored(x, n, [n](int32_t k, double c, double) {
        return 0.62 - 0.48 * std::fabs(static_cast<double>(k) / n - 0.5) - 0.38 * c;
    });
}

template <class T>
Status BohmanWindow(T* x, int32_t n) {
    return PhasorMirrored(x, n, [n](int32_t k, double c, double s) { return s * kInvPi - 2.0 * k / n * c; });
}

// Odd n: every k up to the middle pair. Even n: the middle element is 1 and stays.
template <class T>
Status ParzenWindow(T* x, int32_t n) {
    const double c = n / 2.0;
    return Mirrored(x, n, (n - 1) / 2, [c](int32_t k) {
        const double d = std::fabs(k - c);
        if (d > c / 2) {
            const double u = 1 - d / c;
            return 2 * u * u * u;
        }
        return 1 - 6 / (c * c) * (d * d) + 6 / (c * c * c) * (d * d * d);
    });
}

template <class T>
Status WelchWindow(T* x, int32_t n) {
    const double c = n / 2.0;
    return Mirrored(x, n, (n - 1) / 2, [c](int32_t k) { return 1 - (k - c) * (k - c) * (1 / c) / c; });
}

double KaiserBesselI0(double t) {
    const double t2 = t * t;
    double sum = 1, term = 1;
    for (int i = 1; i <= 25; ++i) {
        term = term * t2 / ((2.0 * i) * (2.0 * i));
        sum += term;
        if (term <= 1e-8) break;
    }
    return sum;
}

// The middle element of an even n is left as it is: its exact value is 1.
template <class T>
Status KaiserWindow(T* x, int32_t n, double beta) {
    if (n < 1) return EmptyArrayErr;
    if (n == 1 || beta == 0) return 0;
    const double i0Beta = KaiserBesselI0(beta);
    x[0] *= KaiserBesselI0(0) / i0Beta;
    const int32_t h = n % 2 ? n / 2 : n / 2 - 1;
    for (int32_t i = 1; i <= h; ++i) {
        const double d = 1 - i * (2.0 / n);
        const double w = KaiserBesselI0(beta * std::sqrt(1 - d * d)) / i0Beta;
        x[i] *= w;
        x[n - i] *= w;
    }
    return 0;
}

template <class T>
Status GaussianWindow(T* x, int32_t n, double sigma, int32_t symmetric) {
    if (n < 1) return EmptyArrayErr;
    if (n == 1) return 0;
    if (sigma <= 0) sigma = 0.2;
    if (symmetric == 0) {
        const double a = -0.5 / ((n + 1.0) * (n + 1.0) * (sigma * sigma));
        x[0] *= std::exp(a * (static_cast<double>(n) * n) / 4);
        for (int32_t k = 1; k <= n / 2; ++k) {
            const double d = k - n / 2.0;
            MulPair(x, n, k, std::exp(a * (d * d)));
        }
    } else {
        const double a = -0.5 / (static_cast<double>(n) * n * (sigma * sigma));
        for (int32_t k = 0; k <= (n - 1) / 2; ++k) {
            const double d = k - (n - 1) / 2.0;
            const double w = std::exp(a * (d * d));
            x[k] *= w;
            x[n - 1 - k] *= w;
        }
    }
    return 0;
}

// A NaN duty keeps nothing, as a duty of 0 does.
template <class T>
Status ForceWindow(T* x, int32_t n, double duty) {
    if (n < 2) return TooFewSamples2Err;
    const double kept = duty * 0.01 * n;
    const int32_t m = kept >= n ? n : kept > 0 ? static_cast<int32_t>(kept) : 0;
    for (int32_t k = m; k < n; ++k) x[k] = T{};
    return 0;
}

template <class T>
Status ExponentialWindow(T* x, int32_t n, double final) {
    if (n < 2) return TooFewSamples2Err;
    if (!(final > 0)) return WindowSumZeroErr;
    const double step = std::log(final) / (n - 1);
    double t = 0;
    for (int32_t k = 0; k < n; ++k) {
        x[k] *= std::exp(t);
        t += step;
    }
    return 0;
}

// A NaN fraction tapers nothing, as a fraction of 0 does.
template <class T>
Status CosineTaper(T* x, int32_t n, double fraction) {
    if (n < 1) return EmptyArrayErr;
    if (!(fraction > 0) || n == 1) return 0;
    if (fraction >= 1) {
        const CosineSumRow& hann = *FindCosineSum(kHann);
        return CosineSum(x, n, hann.a, hann.terms, false);
    }
    const int32_t m = static_cast<int32_t>(fraction * 0.5 * n);
    if (m <= 0) return 0;
    x[0] = T{};
    x[n - 1] = T{};
    const double step = std::numbers::pi / (2 * m);
    double angle = 0;
    for (int32_t i = 1; i < m; ++i) {
        angle += step;
        const double s = std::sin(angle);
        x[i] *= s * s;
        x[n - 1 - i] *= s * s;
    }
    return 0;
}

#define TW_PARAMETRIC_WINDOWS(T)                                     \
    template Status TriangleWindow<T>(T*, int32_t);                  \
    template Status BartlettHannWindow<T>(T*, int32_t);              \
    template Status BohmanWindow<T>(T*, int32_t);                    \
    template Status ParzenWindow<T>(T*, int32_t);                    \
    template Status WelchWindow<T>(T*, int32_t);                     \
    template Status KaiserWindow<T>(T*, int32_t, double);            \
    template Status GaussianWindow<T>(T*, int32_t, double, int32_t); \
    template Status ForceWindow<T>(T*, int32_t, double);             \
    template Status ExponentialWindow<T>(T*, int32_t, double);       \
    template Status CosineTaper<T>(T*, int32_t, double);
TW_PARAMETRIC_WINDOWS(double)
TW_PARAMETRIC_WINDOWS(cdouble)
#undef TW_PARAMETRIC_WINDOWS

}  // namespace tw
