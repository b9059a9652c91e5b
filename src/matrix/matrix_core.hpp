// Core routines of the matrix frame: plain pointers and counts, row-major storage, element (i, j)
// of an m by n matrix at i*n + j. Real and complex twins are one template.
#pragma once

#include <cmath>
#include <complex>
#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

using cdouble = std::complex<double>;

inline constexpr double kEps = 2.220446049250313e-16;

template <class T> struct RealOf { using type = T; };
template <class T> struct RealOf<std::complex<T>> { using type = T; };
template <class T> inline constexpr bool kIsComplex = false;
template <class T> inline constexpr bool kIsComplex<std::complex<T>> = true;

inline double Conj(double x) { return x; }
inline cdouble Conj(cdouble z) { return std::conj(z); }
// Squared magnitude, the measure by which complex pivots are ranked.
inline double Abs2(double x) { return x * x; }
inline double Abs2(cdouble z) { return z.real() * z.real() + z.imag() * z.imag(); }
inline double Magnitude(double x) { return std::fabs(x); }
inline double Magnitude(cdouble z) { return std::sqrt(Abs2(z)); }

inline double Divide(double a, double b) { return a / b; }
// Smith's division: the ratio taken is the one of magnitude at most 1.
inline cdouble Divide(cdouble a, cdouble b) {
    const double c = b.real(), d = b.imag();
    if (std::fabs(d) >= std::fabs(c)) {
        const double r = c / d, den = c * r + d;
        return {(a.real() * r + a.imag()) / den, (a.imag() * r - a.real()) / den};
    }
    const double r = d / c, den = c + d * r;
    return {(a.real() + a.imag() * r) / den, (a.imag() - a.real() * r) / den};
}

// 1 if an element fails the NaN/Infinity screen.
int32_t HasNonFinite(const double* x, int32_t n);
int32_t CxHasNonFinite(const cdouble* x, int32_t n);
inline int32_t Screen(const double* x, int32_t n) { return HasNonFinite(x, n); }
inline int32_t Screen(const cdouble* x, int32_t n) { return CxHasNonFinite(x, n); }

// dst[j*m + i] = src[i*n + j] (conjugated when asked); a null dst transposes src in place.
template <class T, bool Conjugate = false>
Status TransposeMatrix(T* src, int32_t m, int32_t n, T* dst);
inline Status CxTransposeMatrix(cdouble* src, int32_t m, int32_t n, cdouble* dst) {
    return TransposeMatrix<cdouble, false>(src, m, n, dst);
}
inline Status CxConjTransposeMatrix(cdouble* src, int32_t m, int32_t n, cdouble* dst) {
    return TransposeMatrix<cdouble, true>(src, m, n, dst);
}

// c = a b with a m by k and b k by p.
template <class T>
Status MatMul(const T* a, const T* b, int32_t m, int32_t k, int32_t p, T* c, int32_t privateCopies);
inline Status CxMatMul(const cdouble* a, const cdouble* b, int32_t m, int32_t k, int32_t p, cdouble* c,
                       int32_t privateCopies) {
    return MatMul<cdouble>(a, b, m, k, p, c, privateCopies);
}

// y = a x, one plain loop per row.
template <class T> void AxVect(const T* a, int32_t m, int32_t n, const T* x, T* y);

// Singular values, descending, min(m, n) of them.
template <class T> Status SingularValues(const T* a, int32_t m, int32_t n, double* s);

template <class T> Status MatrixNorm(const T* a, int32_t m, int32_t n, int32_t type, double* result);
template <class T> Status MatrixRank(const T* a, int32_t m, int32_t n, double tol, int32_t* rank);
template <class T> Status ConditionNumber(const T* a, int32_t m, int32_t n, int32_t type, double* cond);

// The p-norm of a vector; with normalise non-zero a non-zero norm also scales x to unit norm.
template <class T> Status VectorNorm(T* x, int32_t n, double p, int32_t normalise, double* result);

}  // namespace tw
