#include "transform/spectrum.hpp"

namespace tw {
namespace {

// 1 / (n n) in f64: n n would overflow an i32 beyond n = 46340.
double InverseSquare(int32_t n) { return 1.0 / (static_cast<double>(n) * n); }

double* Lanes(cdouble* p) { return reinterpret_cast<double*>(p); }
const double* Lanes(const cdouble* p) { return reinterpret_cast<const double*>(p); }

// conj(a) b s, with the real and imaginary parts each scaled after the product.
cdouble ConjProduct(double ar, double ai, double br, double bi, double s) {
    return {(ar * br + ai * bi) * s, (ar * bi - ai * br) * s};
}

}  // namespace

Status PowerSpectrum(const FftTable* table, double* x, int32_t n) {
    if (n == 1) {
        x[0] = x[0] * x[0];
        return 0;
    }
    Scratch<double> h;
    Status st = h.Allocate(static_cast<size_t>(n));
    if (st == 0) st = FftRealForward(table, x, h.get(), 1, 1, n);
    if (st == 0) {
        const double s = InverseSquare(n);
        x[0] = h[0] * h[0] * s;
        for (int32_t k = 1; k <= (n - 1) / 2; ++k) x[k] = x[n - k] = (h[k] * h[k] + h[n - k] * h[n - k]) * s;
        if (n % 2 == 0) x[n / 2] = h[n / 2] * h[n / 2] * s;
    }
    return MergeRelease(st, h.Release());
}

Status PowerSpectrum(const FftTable* table, const cdouble* x, double* y, int32_t n) {
    if (n == 1) {
        y[0] = x[0].real() * x[0].real() + x[0].imag() * x[0].imag();
        return 0;
    }
    Scratch<double> split;
    Status st = split.Allocate(2 * static_cast<size_t>(n));
    double* re = split.get();
    double* im = re + (st == 0 ? n : 0);
    if (st == 0) st = FftComplexForward(table, Lanes(x), Lanes(x) + 1, re, im, 2, 1, n);
    if (st == 0) {
        const double s = InverseSquare(n);
        for (int32_t k = 0; k < n; ++k) y[k] = (im[k] * im[k] + re[k] * re[k]) * s;
    }
    return MergeRelease(st, split.Release());
}

// Both half-complex transforms side by side in z: x's in the real lanes, y's in the imaginary ones.
Status CrossSpectrum(const FftTable* table, const double* x, const double* y, cdouble* z, int32_t n) {
    if (n == 1) {
        z[0] = {x[0] * y[0], 0};
        return 0;
    }
    double* a = Lanes(z);
    double* b = a + 1;
    if (const Status st = FftRealForward(table, x, a, 1, 2, n)) return st;
    if (const Status st = FftRealForward(table, y, b, 1, 2, n)) return st;
    const double s = InverseSquare(n);
    z[0] = {a[0] * b[0] * s, 0};
    for (int32_t k = 1; k <= (n - 1) / 2; ++k) {
        const ptrdiff_t lo = 2 * ptrdiff_t{k}, hi = 2 * (ptrdiff_t{n} - k);
        const cdouble c = ConjProduct(a[lo], a[hi], b[lo], b[hi], s);
        z[k] = c;
        z[n - k] = std::conj(c);
    }
    if (n % 2 == 0) z[n / 2] = {a[n] * b[n] * s, 0};
    return 0;
}

Status CrossSpectrum(const FftTable* table, const cdouble* x, const cdouble* y, cdouble* z, int32_t n) {
    if (n == 1) {
        z[0] = ConjProduct(x[0].real(), x[0].imag(), y[0].real(), y[0].imag(), 1);
        return 0;
    }
    Scratch<cdouble> ty;
    Status st = ty.Allocate(static_cast<size_t>(n));
    if (st == 0) st = FftComplexForward(table, Lanes(x), Lanes(x) + 1, Lanes(z), Lanes(z) + 1, 2, 2, n);
    if (st == 0)
        st = FftComplexForward(table, Lanes(y), Lanes(y) + 1, Lanes(ty.get()), Lanes(ty.get()) + 1, 2, 2, n);
    if (st == 0) {
        const double s = InverseSquare(n);
        for (int32_t k = 0; k < n; ++k)
            z[k] = ConjProduct(z[k].real(), z[k].imag(), ty[k].real(), ty[k].imag(), s);
    }
    return MergeRelease(st, ty.Release());
}

}  // namespace tw
