#include "signal/convolve.hpp"

#include <algorithm>
#include <cstring>
#include <utility>

#include "transform/fft/fft.hpp"

namespace tw {
namespace {

using cdouble = std::complex<double>;

double* Lanes(cdouble* p) { return reinterpret_cast<double*>(p); }
const double* Lanes(const cdouble* p) { return reinterpret_cast<const double*>(p); }

size_t Size(int32_t n) { return static_cast<size_t>(n); }

constexpr int32_t kPinLimit = 1 << 20;

// References held per thread, most recent first.
struct PinnedTables {
    FftTable* t[2] = {nullptr, nullptr};
    PinnedTables() = default;
    PinnedTables(const PinnedTables&) = delete;
    PinnedTables& operator=(const PinnedTables&) = delete;
    ~PinnedTables() {
        for (FftTable* p : t) DestroyFftTable(p);
    }
};
thread_local PinnedTables pinned;

// a *= b bin by bin on half-complex spectra of length n; with power set, a becomes |a|^2 (b unused).
void MultiplyHalfComplex(double* a, const double* b, int32_t n, bool power) {
    if (power) {
        a[0] = a[0] * a[0];
        for (int32_t k = 1; k <= (n - 1) / 2; ++k) {
            const double re = a[k], im = a[n - k];
            a[k] = re * re + im * im;
            a[n - k] = 0.0;
        }
        if (n % 2 == 0) a[n / 2] = a[n / 2] * a[n / 2];
        return;
    }
    a[0] = a[0] * b[0];
    for (int32_t k = 1; k <= (n - 1) / 2; ++k) {
        const double ar = a[k], ai = a[n - k], br = b[k], bi = b[n - k];
        a[k] = ar * br - ai * bi;
        a[n - k] = ar * bi + ai * br;
    }
    if (n % 2 == 0) a[n / 2] = a[n / 2] * b[n / 2];
}

// The frequency-domain real convolution; reverseX puts x into its padding reversed.
Status RealFrequency(const double* x, int32_t nx, const double* y, int32_t ny, double* z, bool reverseX) {
    const int32_t m = nx + ny - 1;
    const int32_t n = ConvolutionFftLength(m);
    if (n == 0) return OutOfMemoryErr;
    CallTable table(n);
    if (table.get() == nullptr) return OutOfMemoryErr;
    Scratch<double> work;
    if (const Status s = work.Allocate(3 * Size(n))) return s;
    double* a = work.get();
    double* b = a + n;
    double* c = b + n;
    std::fill(a, a + 2 * Size(n), 0.0);
    if (reverseX)
        std::reverse_copy(x, x + nx, a);
    else
        std::copy(x, x + nx, a);
    std::copy(y, y + ny, b);
    Status s = FftRealForward(table.get(), a, c, 1, 1, n);
    if (s == 0) s = FftRealForward(table.get(), b, a, 1, 1, n);
    if (s == 0) {
        MultiplyHalfComplex(c, a, n, false);
        s = FftRealInverse(table.get(), c, b, 1, 1, n);
    }
    if (s == 0) std::copy(b, b + m, z);
    return MergeRelease(s, work.Release());
}

// z[k] = sum of x[i] y[k - i] over the overlap, x the longer sequence, in increasing i.
void ComplexDot(const cdouble* x, int32_t nx, const cdouble* y, int32_t ny, cdouble* z) {
    const double* xs = Lanes(x);
    const double* ys = Lanes(y);
    for (int32_t k = 0; k < nx + ny - 1; ++k) {
        const int32_t lo = std::max(0, k - ny + 1), hi = std::min(k, nx - 1);
        double re = 0.0, im = 0.0;
        for (int32_t i = lo; i <= hi; ++i) {
            const double ar = xs[2 * i], ai = xs[2 * i + 1];
            const double br = ys[2 * (k - i)], bi = ys[2 * (k - i) + 1];
            re += ar * br - ai * bi;
            im += ar * bi + ai * br;
        }
        z[k] = {re, im};
    }
}

}  // namespace

CallTable::CallTable(int32_t n) : t_(CreateFftTable(n)) {
    if (t_ == nullptr || n > kPinLimit || pinned.t[0] == t_) return;
    if (pinned.t[1] == t_) {
        std::swap(pinned.t[0], pinned.t[1]);
        return;
    }
    FftTable* extra = CreateFftTable(n);  // another reference to the same table
    DestroyFftTable(pinned.t[1]);
    pinned.t[1] = pinned.t[0];
    pinned.t[0] = extra;
}

void ConvolveDirect(const double* x, int32_t nx, const double* y, int32_t ny, double* z) {
    std::fill(z, z + Size(nx + ny - 1), 0.0);
    for (int32_t i = 0; i < nx; ++i) {
        const double xi = x[i];
        double* zi = z + i;
        for (int32_t j = 0; j < ny; ++j) zi[j] += xi * y[j];
    }
}

void CorrelateDirect(const double* x, int32_t nx, const double* y, int32_t ny, double* z) {
    std::fill(z, z + Size(nx + ny - 1), 0.0);
    for (int32_t j = 0; j < ny; ++j) {
        const double yj = y[j];
        double* zj = z + j;
        for (int32_t i = 0; i < nx; ++i) zj[i] += x[nx - 1 - i] * yj;
    }
}

int32_t ConvolutionFftLength(int32_t m) { return FftNextFastSize(m); }

Status ConvolveFrequency(const double* x, int32_t nx, const double* y, int32_t ny, double* z) {
    return RealFrequency(x, nx, y, ny, z, false);
}

Status CorrelateFrequency(const double* x, int32_t nx, const double* y, int32_t ny, double* z) {
    return RealFrequency(x, nx, y, ny, z, true);
}

Status AutoCorrelateFrequency(const double* x, int32_t n, double* z) {
    const int32_t len = ConvolutionFftLength(2 * n - 1);
    if (len == 0) return OutOfMemoryErr;
    CallTable table(len);
    if (table.get() == nullptr) return OutOfMemoryErr;
    Scratch<double> work;
    if (const Status s = work.Allocate(2 * Size(len))) return s;
    double* a = work.get();
    double* r = a + len;
    std::copy(x, x + n, a);
    std::fill(a + n, a + len, 0.0);
    Status s = FftRealForward(table.get(), a, r, 1, 1, len);
    if (s == 0) {
        MultiplyHalfComplex(r, r, len, true);
        s = FftRealInverse(table.get(), r, a, 1, 1, len);
    }
    if (s == 0) {
        std::copy(a, a + n, z + (n - 1));
        std::copy(a + (len - n + 1), a + len, z);
    }
    return MergeRelease(s, work.Release());
}

void CxConvolveDirect(const cdouble* x, int32_t nx, const cdouble* y, int32_t ny, cdouble* z) {
    if (nx >= ny)
        ComplexDot(x, nx, y, ny, z);
    else
        ComplexDot(y, ny, x, nx, z);
}

Status CxConvolveFrequency(const cdouble* x, int32_t nx, const cdouble* y, int32_t ny, cdouble* z) {
    const int32_t m = nx + ny - 1;
    const int32_t n = ConvolutionFftLength(m);
    if (n == 0) return OutOfMemoryErr;
    CallTable table(n);
    if (table.get() == nullptr) return OutOfMemoryErr;
    Scratch<cdouble> work;
    if (const Status s = work.Allocate(3 * Size(n))) return s;
    cdouble* a = work.get();
    cdouble* b = a + n;
    cdouble* c = b + n;
    const auto forward = [&](const cdouble* v, int32_t nv, cdouble* out) {
        std::copy(v, v + nv, a);
        std::fill(a + nv, a + n, cdouble{});
        return FftComplexForward(table.get(), Lanes(a), Lanes(a) + 1, Lanes(out), Lanes(out) + 1, 2, 2, n);
    };
    Status s = forward(x, nx, b);
    if (s == 0) s = forward(y, ny, c);
    if (s == 0) {
        double* p = Lanes(b);
        const double* q = Lanes(c);
        for (size_t k = 0; k < 2 * Size(n); k += 2) {
            const double ar = p[k], ai = p[k + 1];
            p[k] = ar * q[k] - ai * q[k + 1];
            p[k + 1] = ar * q[k + 1] + ai * q[k];
        }
        s = FftComplexInverse(table.get(), Lanes(b), Lanes(b) + 1, Lanes(a), Lanes(a) + 1, 2, 2, n);
    }
    if (s == 0) std::copy(a, a + m, z);
    return MergeRelease(s, work.Release());
}

template <class T>
Status NormalizeCorrelation(T* z, int32_t nx, int32_t ny, int32_t normalization) {
    const int32_t lo = std::min(nx, ny), hi = std::max(nx, ny);
    if (normalization == 0) return 0;
    if (normalization == 1) {
        for (int32_t i = 0; i <= lo - 2; ++i) {
            z[i] /= static_cast<double>(i + 1);
            z[hi + i] /= static_cast<double>(lo - 1 - i);
        }
        for (int32_t i = lo - 1; i <= hi - 1; ++i) z[i] /= static_cast<double>(lo);
        return 0;
    }
    if (normalization == 2) {
        for (int32_t i = 0; i < nx + ny - 1; ++i) z[i] /= static_cast<double>(hi);
        return 0;
    }
    return InvalidSelectorErr;
}

template Status NormalizeCorrelation<double>(double*, int32_t, int32_t, int32_t);
template Status NormalizeCorrelation<cdouble>(cdouble*, int32_t, int32_t, int32_t);

}  // namespace tw
