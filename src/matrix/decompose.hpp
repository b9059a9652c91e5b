// The library's own factorisations: Crout LU, Golub-Reinsch SVD, and the solves built on LU.
#pragma once

#include <cstddef>
#include <cstdint>

#include "matrix/matrix_core.hpp"

namespace tw {

// Crout LU with partial pivoting in place on an m by n matrix. perm gets m entries, each the row
// exchanged with that row at its step (0-based). +20003 for a column without a usable pivot.
template <class T> Status LuFactor(T* a, int32_t m, int32_t n, int32_t* perm, int32_t* parity);
template <class T> Status LuFactorSquare(T* a, int32_t n, int32_t* perm, int32_t* parity) {
    return LuFactor(a, n, n, perm, parity);
}

// Solves with the factors of LuFactor; x null solves in place in b.
template <class T> Status LuSolve(const T* lu, const int32_t* perm, T* b, int32_t n, T* x);
// inv = a^-1 column by column; inv may be the factors' own block.
template <class T> Status LuInverse(const T* lu, const int32_t* perm, int32_t n, T* inv);

// Elements of T that ReentrantSvd needs as work for an m by n matrix.
template <class T> size_t SvdWorkSize(int32_t m, int32_t n);

// a = U diag(s) V^H with U m by r and V n by r, r = min(m, n), s descending. u and v may be null
// for values only. Allocates nothing: work holds SvdWorkSize elements; with work null only
// *needed is set.
template <class T>
Status ReentrantSvd(const T* a, int32_t m, int32_t n, T* u, double* s, T* v, T* work, size_t* needed);

// As ReentrantSvd with its work from the scratch allocator.
template <class T> Status FullSvd(const T* a, int32_t m, int32_t n, T* u, double* s, T* v);

// QR through the LQ of the same memory read column-major. option 0: Q m by m, R m by n; 1: Q m by r,
// R r by n (r = min(m, n)); 2: R only, r by n. Either output may be null.
template <class T> Status QrHouseholder(const T* a, int32_t m, int32_t n, int32_t option, T* q, T* r);
// Column-pivoted QR, a P = Q R, with the same options and shapes; perm gets n 0-based column numbers,
// column i of a P being column perm[i] of a.
template <class T>
Status QrPivoted(const T* a, int32_t m, int32_t n, int32_t option, int32_t* perm, T* q, T* r);
// Output shapes of an option: rows and columns of Q, rows of R.
void QrShape(int32_t m, int32_t n, int32_t option, int32_t* qRows, int32_t* qCols, int32_t* rRows);

// Plain and fast Givens QR: Q m by m, R m by n.
Status QrGivens(const double* a, int32_t m, int32_t n, double* q, double* r);
Status QrFastGivens(const double* a, int32_t m, int32_t n, double* q, double* r);

// The SVD with square factors (U m by m, V n by n) when full is non-zero.
template <class T> Status FullSvd(const T* a, int32_t m, int32_t n, T* u, double* s, T* v, int32_t full);

// Upper Hessenberg form of the n by n a in place, reducing rows and columns ilo..ihi (0-based);
// q gets the orthogonal factor, a = Q H Q^H.
template <class T> Status HessenbergReduce(T* a, int32_t n, int32_t ilo, int32_t ihi, T* q);
// Balancing in place; job 0 none, 1 permute, 2 scale, 3 both. ilo and ihi 0-based; scale as LAPACK
// writes it (the 1-based numbers of permuted rows included).
template <class T>
Status MatrixBalance(T* a, int32_t n, int32_t job, int32_t* ilo, int32_t* ihi, double* scale);
// Generalised SVD of the m by n a and the p by n b: s gets the n ratios alpha/beta. With vectors
// set, a = U D1 Q and b = V D2 Q, where U is m by m (full) or m by min(m, n), V likewise with p,
// D1 and D2 have as many rows as U and V have columns and n columns, and Q is n by n.
template <class T>
Status GeneralisedSvd(const T* a, int32_t m, int32_t n, const T* b, int32_t p, int32_t vectors, int32_t full, double* s,
                      T* u, T* v, T* q, T* d1, T* d2);

// Compact storage of triangular and symmetric matrices (kind 0 lower, 1 upper, 2 symmetric).
// The order of a compact array of length L, or -20040 when L is not triangular.
Status CompactOrder(int32_t length, int32_t* n);
template <class T> void PackCompact(const T* a, int32_t n, int32_t kind, T* compact);
template <class T> void ExpandCompact(const T* compact, int32_t n, int32_t kind, T* a);

}  // namespace tw
