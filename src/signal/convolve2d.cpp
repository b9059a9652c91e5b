#include <algorithm>
#include <type_traits>

#include "signal/convolve.hpp"
#include "transform/fft/fft.hpp"
#include "transform/fft2d.hpp"

namespace tw {
namespace {

using cdouble = std::complex<double>;

size_t Idx(int32_t r, int32_t c, int32_t ld) {
    return static_cast<size_t>(r) * static_cast<size_t>(ld) + static_cast<size_t>(c);
}

// Products written out, so that no library call intervenes for infinite or NaN operands.
inline double Mul(double a, double b) { return a * b; }
inline cdouble Mul(cdouble a, cdouble b) {
    return {a.real() * b.real() - a.imag() * b.imag(), a.real() * b.imag() + a.imag() * b.real()};
}

// z[i][j] = sum over the kernel k[p][q] b[i - p][j - q], terms outside b skipped.
template <class T>
void KernelSums(const T* b, int32_t rb, int32_t cb, const T* k, int32_t rk, int32_t ck, T* z) {
    const int32_t rows = rb + rk - 1, cols = cb + ck - 1;
    for (int32_t i = 0; i < rows; ++i) {
        for (int32_t j = 0; j < cols; ++j) {
            T acc{};
            for (int32_t p = 0; p < rk; ++p) {
                const int32_t r = i - p;
                if (r < 0 || r >= rb) continue;
                for (int32_t q = 0; q < ck; ++q) {
                    const int32_t c = j - q;
                    if (c < 0 || c >= cb) continue;
                    acc += Mul(k[Idx(p, q, ck)], b[Idx(r, c, cb)]);
                }
            }
            z[Idx(i, j, cols)] = acc;
        }
    }
}

}  // namespace

template <class T>
void Convolve2DDirect(const T* x, int32_t r1, int32_t c1, const T* y, int32_t r2, int32_t c2, T* z) {
    if (int64_t{r2} * c2 <= int64_t{r1} * c1)
        KernelSums(x, r1, c1, y, r2, c2, z);
    else
        KernelSums(y, r2, c2, x, r1, c1, z);
}

template <class T>
Status Convolve2DFrequency(const T* x, int32_t r1, int32_t c1, const T* y, int32_t r2, int32_t c2, T* z) {
    const int32_t rows = r1 + r2 - 1, cols = c1 + c2 - 1;
    // The row transforms run on length cols, the columns on length rows: one table when equal.
    CallTable rowCall(cols);
    CallTable colCall(rows == cols ? 0 : rows);
    const FftTable* rowTable = rowCall.get();
    const FftTable* colTable = rows == cols ? rowTable : colCall.get();
    if (rowTable == nullptr || colTable == nullptr) return OutOfMemoryErr;
    // Real data keep only the row frequencies 0 .. cols/2 of their spectra (the rest is their
    // conjugate mirror) and come back through the real inverse of that half: the real part of
    // the full complex inverse, for half the work.
    constexpr bool kReal = std::is_same_v<T, double>;
    const size_t n = static_cast<size_t>(rows) * static_cast<size_t>(kReal ? cols / 2 + 1 : cols);
    Scratch<cdouble> work;
    if (const Status s = work.Allocate(2 * n)) return s;
    cdouble* fx = work.get();
    cdouble* fy = fx + n;
    const auto spectrum = [&](const T* v, int32_t rv, int32_t cv, cdouble* out) {
        const Fft2DWindow w{rv, cv, 0, 0, rows, cols};
        if constexpr (kReal)
            return Fft2DRealForwardHalf(rowTable, colTable, v, w, out);
        else
            return Fft2DComplexForward(rowTable, colTable, v, w, 0, out);
    };
    Status s = spectrum(x, r1, c1, fx);
    if (s == 0) s = spectrum(y, r2, c2, fy);
    if (s == 0) {
        for (size_t i = 0; i < n; ++i) fx[i] = Mul(fx[i], fy[i]);
        if constexpr (kReal)
            s = Fft2DRealInverseHalf(rowTable, colTable, fx, rows, cols, z);
        else
            s = Fft2DComplexInverse(rowTable, colTable, fx, rows, cols, 0, z);
    }
    return MergeRelease(s, work.Release());
}

template void Convolve2DDirect<double>(const double*, int32_t, int32_t, const double*, int32_t, int32_t,
                                       double*);
template void Convolve2DDirect<cdouble>(const cdouble*, int32_t, int32_t, const cdouble*, int32_t, int32_t,
                                        cdouble*);
template Status Convolve2DFrequency<double>(const double*, int32_t, int32_t, const double*, int32_t, int32_t,
                                            double*);
template Status Convolve2DFrequency<cdouble>(const cdouble*, int32_t, int32_t, const cdouble*, int32_t,
                                             int32_t, cdouble*);

}  // namespace tw
