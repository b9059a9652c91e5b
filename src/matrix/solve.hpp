// Solvers, inverses and determinants: the SVD route for any shape, the library's own Cholesky and
// substitution on compact storage, and the band and tridiagonal routes through LAPACK. Real and
// complex twins are one template.
#pragma once

#include <cstddef>
#include <cstdint>

#include "matrix/decompose.hpp"

namespace tw {

// Compact positions: lower layout (kinds 0 and 2) and upper layout (kind 1), for i and j of the
// stored triangle.
inline size_t LowerAt(int32_t n, int32_t i, int32_t j) {
    return static_cast<size_t>(j) * n - static_cast<size_t>(j) * (j - 1) / 2 + static_cast<size_t>(i - j);
}
inline size_t UpperAt(int32_t i, int32_t j) { return static_cast<size_t>(j) * (j + 1) / 2 + static_cast<size_t>(i); }

// --- SVD route ---------------------------------------------------------------------------------

// x = A^+ b for the m by n a and the m by k b, x n by k. Singular values at or below
// max(m, n) s0 tol are dropped (tol not above 0 means eps); +20001 when any was dropped. x may be b.
template <class T>
Status SolveBySvd(const T* a, int32_t m, int32_t n, const T* b, int32_t k, T* x, double tol);

// The same with every block carved out of work (SvdSolveWorkSize elements); with work null only
// *needed is set. x must not overlap b.
template <class T> size_t SvdSolveWorkSize(int32_t m, int32_t n);
template <class T>
Status ReentrantSolveBySvd(const T* a, int32_t m, int32_t n, const T* b, int32_t k, T* x, double tol, T* work,
                           size_t* needed);

// refinements 0 is ReentrantSolveBySvd with k = 1. From 1 on, the cut-off is s0 tol and x is built
// by that many passes of x += V S^-1 U^H (b - A x) from x = 0.
template <class T> size_t SvdRefineWorkSize(int32_t m, int32_t n);
template <class T>
Status RefinedSolveBySvd(const T* a, int32_t m, int32_t n, const T* b, T* x, double tol, int32_t refinements, T* work,
                         size_t* needed);

// The n by m pseudo-inverse; tol below 0 means max(m, n) s0 eps, otherwise it is an absolute cut-off.
template <class T> Status PseudoInverse(const T* a, int32_t m, int32_t n, double tol, T* out);

// --- LU route ----------------------------------------------------------------------------------

// A x = b for the n by n matrix held in the first rows of the rows by n a (missing rows count as 0);
// a singular pivot is -20041.
template <class T> Status SolveByLu(const T* a, int32_t rows, int32_t n, const T* b, T* x);
// The inverse in place; a singular pivot is -20041.
template <class T> Status InvertByLu(T* a, int32_t n);

// --- Cholesky and substitution on compact storage ----------------------------------------------

// A = L L^H in place on the lower layout. A diagonal not above 0 is -20071 at once; the real form
// also reports -20071, but finishes, when a diagonal element falls below sqrt(eps) times the
// largest element of the factor.
template <class T> Status CholeskyFactor(T* l, int32_t n);
// x = (L L^H)^-1 b, one right-hand side; x may be b.
template <class T> void CholeskySolve(const T* l, const T* b, int32_t n, T* x);
// The same for the n by k right-hand sides of b (row-major), in place.
template <class T> void CholeskySolveSet(const T* l, int32_t n, T* b, int32_t k);
// (L L^H)^-1 in the lower layout, in place of L, with column as n elements of workspace.
template <class T> void CholeskyInverse(T* l, int32_t n, T* column);
// Compact lower layout of the upper triangle read by rows (conjugated for complex data): the
// factor of that layout is R^H, where A = R^H R.
template <class T> void PackUpperRows(const T* a, int32_t n, T* compact);
// The upper triangular R with A = R^H R in place of the n by n a, from its upper triangle (the
// imaginary parts of the diagonal are cleared first).
template <class T> Status FullCholesky(T* a, int32_t n);
// Driver: packs the lower (triangle 0) or upper (1) triangle of a, screens, factors and solves the
// n by k right-hand sides of b into x.
template <class T>
Status SolveByCholesky(const T* a, int32_t n, int32_t triangle, const T* b, int32_t k, T* x);
// The inverse of L L^H from the factor, in place, in the lower layout.
template <class T> Status InvertFromCholesky(T* l, int32_t n);
// Driver: the inverse of a from its lower triangle, over both triangles.
template <class T> Status InvertByCholesky(T* a, int32_t n);
// The inner-loop form: packs into work1, factors without the screen and the sqrt(eps) test (a
// non-positive diagonal gives -20071 and the loop goes on), and spreads the inverse over a.
Status PreallocCholeskyInverse(double* a, int32_t n, double* work1, double* work2);

// T x = b for the n by k b (row-major), kind 0 lower, 1 upper. The real form leaves b as it is for
// any other kind; the complex one reports -20061.
template <class T> Status CompactTriSolve(const T* t, int32_t n, const T* b, int32_t k, int32_t kind, T* x);
// The inverse on compact storage; out may be t.
template <class T> Status CompactTriInverse(const T* t, int32_t n, int32_t kind, T* out);
// The same on the lower (kind 0) or upper (1) triangle of the full n by n a: the solve of the n by k
// b into x, and the inverse in place, with the other triangle cleared.
template <class T>
Status SolveTriangular(const T* a, int32_t n, int32_t kind, const T* b, int32_t k, T* x);
template <class T> Status InvertTriangular(T* a, int32_t n, int32_t kind);

// --- Band and tridiagonal routes ---------------------------------------------------------------

// ab holds kl + ku + 1 rows and n columns of band storage; b is n by nrhs and becomes x.
template <class T> Status BandSolve(const T* ab, int32_t n, int32_t kl, int32_t ku, T* b, int32_t nrhs);
// The tridiagonal LU: on success the factors replace dl, d, du; on a zero pivot (+20003) they stay
// as they were, and du2 and ipiv hold what the factorisation wrote.
Status TriDiagFactor(double* dl, double* d, double* du, double* du2, int32_t* ipiv, int32_t n);
// Solve with those factors, b n by nrhs; trans 0 solves A x = b, anything else A^T x = b.
Status TriDiagSolve(int32_t trans, const double* dl, const double* d, const double* du, const double* du2,
                    const int32_t* ipiv, int32_t n, double* b, int32_t nrhs);

// --- Determinant -------------------------------------------------------------------------------

// type: 0 general (LU), 1 positive definite (Cholesky), 2 and 3 triangular.
template <class T> Status Determinant(const T* a, int32_t n, int32_t type, T* result);

}  // namespace tw
