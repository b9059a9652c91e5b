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

}  // namespace tw
