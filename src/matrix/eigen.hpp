// Eigenvalues and eigenvectors, Schur forms and the generalised (QZ) problem. Matrices are
// row-major n by n; eigenvectors are the columns of an n by n block, each of unit 2-norm.
#pragma once

#include <cstdint>

#include "matrix/lapack.hpp"
#include "matrix/matrix_core.hpp"

namespace tw {

// Real symmetric: Householder tridiagonalisation and implicit QL. Only a[i][j] with j <= i is
// read. values ascending; vectors (output non-zero) may be a itself.
Status SymmetricEigen(const double* a, int32_t n, int32_t output, double* values, double* vectors);
// Complex Hermitian, lower triangle read; values ascending with imaginary parts exactly 0.
Status HermitianEigen(const cdouble* a, int32_t n, int32_t output, cdouble* values, cdouble* vectors);

// Real general: balancing, elimination to Hessenberg form and double-shift QR. Values in the
// order the iteration leaves them; a complex pair is adjacent, positive imaginary part first, the
// second the exact conjugate of the first (vectors x + iy and x - iy). vectors may be null when
// output is 0.
Status GeneralEigen(const double* a, int32_t n, int32_t output, cdouble* values, cdouble* vectors);
// Complex general: unitary Hessenberg reduction and single-shift complex QR.
Status CxGeneralEigen(const cdouble* a, int32_t n, int32_t output, cdouble* values, cdouble* vectors);

// The monic polynomial prod (z - r[i]) into c, low power first (n + 1 coefficients). Returns the
// degree of the product.
int32_t PolyFromRoots(const cdouble* r, int32_t n, cdouble* c);

// Schur form a = Q T Q^H. order: 0 none, 1 ascending real part, 2 descending real part,
// 3 ascending magnitude, 4 descending magnitude. q null: no Schur vectors. select may be null;
// sdim may be null. t receives T, values the eigenvalues along its diagonal.
Status SchurDecomp(const double* a, int32_t n, uint32_t order, DgeesSelect select, int32_t* sdim, double* q,
                   double* t, cdouble* values);
Status CxSchurDecomp(const cdouble* a, int32_t n, uint32_t order, ZgeesSelect select, int32_t* sdim, cdouble* q,
                     cdouble* t, cdouble* values);

// Generalised Schur form of the pencil (a, b). mode 0: the Hessenberg-triangular form goes to
// s, t, q, z and the eigenvalues follow; mode 1: the generalised Schur form, ordered by order
// (+20005 when an undefined eigenvalue abandons the order). rowMajorQ 0 leaves Q as LAPACK holds
// it (the caller reads Q^T). useDriver selects the one-call driver (mode 1 only). beta is f64 for
// real data; right and left get the eigenvectors in LAPACK's storage, transposed to row-major.
// Any output may be null.
template <class T>
Status GeneralisedSchur(const T* a, const T* b, int32_t n, int32_t rowMajorQ, int32_t mode, int32_t order,
                        int32_t useDriver, T* s, T* t, T* q, T* z, cdouble* alpha, T* beta, T* right, T* left);

// Test hook: when set, the first ordering exchange of the generalised Schur form reports a
// failure, so that the retry by the driver is taken.
extern thread_local bool gFailQzExchange;

}  // namespace tw
