// Functions of a square matrix (exponential, logarithm, square root, integer power), generated
// matrices, the autocorrelation matrix, the symmetry and definiteness checks, and the Sylvester
// and Lyapunov equations. Matrices are row-major n by n unless stated otherwise.
#pragma once

#include <cstdint>

#include "matrix/matrix_core.hpp"

namespace tw {

// exp(a) in place: Pade approximation with scaling and squaring. The complex form reports a
// singular denominator (-20041); the real one does not test it.
template <class T> Status MatrixExp(T* a, int32_t n);

// Principal logarithm of a into out by the eigen route, with the inverse-scaling fallback,
// perturbation and Newton correction; +20006 when the best result misses its accuracy test.
// realInput non-zero takes eigenvalues and Schur diagonals on the negative real axis with a
// tiny imaginary part as lying on its upper side.
Status CxMatrixLog(const cdouble* a, int32_t n, cdouble* out, int32_t realInput);
// Logarithm by repeated square roots and terms of the Mercator series; -20062 after 100 roots.
Status MatrixLogByRoots(const cdouble* a, int32_t n, cdouble* out, int32_t terms, double threshold,
                        int32_t realInput);
// Principal square root by the Schur method; +20006 when two or more eigenvalues vanish.
Status CxMatrixSqrt(const cdouble* a, int32_t n, cdouble* out, int32_t realInput);

// a^power in place; a negative power inverts through the pseudo-inverse first.
template <class T> Status MatrixPower(T* a, int32_t n, int32_t power);
// The n + 1 coefficients of det(zI - a), low power first.
template <class T> Status CharacteristicPoly(const T* a, int32_t n, cdouble* c);
// The m p by n q Kronecker product of the m by n a and the p by q b.
template <class T> void KroneckerProduct(const T* a, int32_t m, int32_t n, const T* b, int32_t p, int32_t q, T* c);

// Size of the generated matrix of a type (rows, cols) or its status; x and y are the lengths.
Status SpecialMatrixShape(int32_t type, int32_t size, int32_t nx, int32_t ny, int32_t* rows, int32_t* cols);
template <class T>
void SpecialMatrix(int32_t type, const T* x, int32_t nx, const T* y, int32_t rows, int32_t cols, T* out);

// Rows of the data matrix of an autocorrelation type, or -1 for an unknown type.
int32_t AutoCorrRows(int32_t type, int32_t n, int32_t m);
// First block (count 0): the scaled data matrix into xm and r = xm^H xm. Continuing block: r
// becomes (count r + the products of the rows of the new times) / (count + n), those rows (of
// every type, forward only) scaled by 1/sqrt(count + n) into xm. prev holds the m samples before
// x and receives the last m of the joined record.
template <class T>
Status AutoCorrMatrix(const T* x, int32_t n, T* prev, int32_t m, int32_t type, int32_t count, T* r, T* xm);

// Symmetry (complex: hermitian non-zero compares with the conjugate) within the threshold of tol
// and relative; *result 1 or 0.
template <class T>
Status CheckSymmetric(const T* a, int32_t n, double tol, int32_t relative, int32_t hermitian, int32_t* result);
template <class T> Status CheckPositiveDefinite(const T* a, int32_t n, int32_t* result);
template <class T> Status CheckPositiveSemiDefinite(const T* a, int32_t n, double tol, int32_t* result, int32_t* rank);

// A X + X A^H = scale Q (type 0) or A X A^H - X = Q (type 1) for the n by n a and q; X replaces
// q. form 1: a is already upper (quasi-)triangular.
template <class T> Status Lyapunov(const T* a, T* q, int32_t n, int32_t form, int32_t type, double* scale);
// op(A) X + sign X op(B) = scale C, A m by m, B n by n, C m by n and replaced by X.
template <class T>
Status Sylvester(const T* a, const T* b, T* c, int32_t m, int32_t n, int32_t transA, int32_t transB, int32_t sign,
                 int32_t form, double* scale, int32_t* perturbed);

}  // namespace tw
