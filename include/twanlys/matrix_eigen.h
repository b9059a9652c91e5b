/* Eigenvalues and eigenvectors, Schur forms, the generalised problem (QZ), back-transformation
 * after balancing and the companion matrix. Matrices are 2-D handles of f64 or ComplexDouble
 * elements, row-major; eigenvectors are columns of unit 2-norm. */
#ifndef TWANLYS_MATRIX_EIGEN_H
#define TWANLYS_MATRIX_EIGEN_H

#include "twanlys/matrix.h"
#include "twanlys/types.h"

/* 0 values only, 1 values and vectors. */
typedef int32_t EigenOutput;
/* 0 none, 1 ascending real part, 2 descending real part, 3 ascending magnitude, 4 descending
 * magnitude. */
typedef uint32_t SchurOrder;
/* The BalanceJob of the balancing that is undone: 0 none, 1 permute, 2 scale, 3 both. */
typedef int32_t EigenBackJob;
/* 0 none, 1 right, 2 left, 3 both. */
typedef int32_t QzVectors;

/* Real general matrix: complex values, and vectors as columns when output is 1. */
TW_API int32_t EigenValueVector_head(Array2DHandle a, EigenOutput* output, Array1DHandle values,
                                     Array2DHandle vectors, int32_t* status);
/* Complex matrix, general (hermitian 0) or Hermitian (1, lower triangle read); the vectors
 * replace A, which is emptied for values only. */
TW_API int32_t CxEigenValueVector_head(Array2DHandle a, int32_t* hermitian, EigenOutput* output,
                                       Array1DHandle values, int32_t* status);
/* Real symmetric matrix, lower triangle read: ascending values; A holds the vectors, or is
 * emptied for values only. */
TW_API int32_t SymEvectorEvalue_head(Array2DHandle a, EigenOutput* output, Array1DHandle values, int32_t* status);

/* Schur form A = Q T Q^H: T replaces A; Q is emptied when wantQ is 0. */
TW_API int32_t Schur_head(Array2DHandle a, int32_t wantQ, Array2DHandle q, Array1DHandle values);
TW_API int32_t CxSchur_head(Array2DHandle a, int32_t wantQ, Array2DHandle q, Array1DHandle values);
TW_API int32_t Schur80_head(Array2DHandle a, int32_t wantQ, SchurOrder order, Array2DHandle q,
                            Array1DHandle values);
TW_API int32_t CxSchur80_head(Array2DHandle a, int32_t wantQ, SchurOrder order, Array2DHandle q,
                              Array1DHandle values);

/* Generalised problem A x = lambda B x, lambda = alpha / beta. mode 0 leaves the left and right
 * orthogonal factors of the Hessenberg-triangular form in A and B, mode 1 those of the
 * generalised Schur form; vectors gets the right eigenvectors. Real beta is f64. */
TW_API int32_t QZ_head(Array2DHandle a, Array2DHandle b, Array1DHandle alpha, Array1DHandle beta,
                       Array2DHandle vectors);
TW_API int32_t CxQZ_head(Array2DHandle a, Array2DHandle b, Array1DHandle alpha, Array1DHandle beta,
                         Array2DHandle vectors);
TW_API int32_t QZ80_head(Array2DHandle a, Array2DHandle b, int32_t mode, SchurOrder order, Array1DHandle alpha,
                         Array1DHandle beta, Array2DHandle vectors);
TW_API int32_t CxQZ80_head(Array2DHandle a, Array2DHandle b, int32_t mode, SchurOrder order, Array1DHandle alpha,
                           Array1DHandle beta, Array2DHandle vectors);
/* The generalised Schur form: A gets S, B gets T, q the left factor as LAPACK stores it, read
 * row-major its transpose (S = q A z; complex: S = conj(q) A z), z row-major. Real eigenvectors
 * come in the real storage of pairs (real part, imaginary part in the next column). */
TW_API int32_t TmiQZ_head(Array2DHandle a, Array2DHandle b, Array2DHandle q, Array2DHandle z, Array1DHandle alpha,
                          Array1DHandle beta, QzVectors which, Array2DHandle right, Array2DHandle left);
TW_API int32_t CxTmiQZ_head(Array2DHandle a, Array2DHandle b, Array2DHandle q, Array2DHandle z,
                            Array1DHandle alpha, Array1DHandle beta, QzVectors which, Array2DHandle right,
                            Array2DHandle left);
/* Generalised eigenvalues alpha / beta (Infinity where beta is 0); A and B are not changed. */
TW_API int32_t GenEigenEx_head(Array2DHandle a, Array2DHandle b, int32_t wantVectors, Array1DHandle values,
                               Array2DHandle vectors);
TW_API int32_t CxGenEigenEx_head(Array2DHandle a, Array2DHandle b, int32_t wantVectors, Array1DHandle values,
                                 Array2DHandle vectors);

/* Undoes a balancing on the rows of V: ilo and ihi 0-based, scale as MatrixBalance_head writes
 * it; side 0 left vectors, else right. */
TW_API int32_t EigenVBack_head(Array2DHandle v, EigenBackJob job, int32_t side, int32_t ilo, int32_t ihi,
                               Array1DHandle scale);
TW_API int32_t CxEigenVBack_head(Array2DHandle v, EigenBackJob job, int32_t side, int32_t ilo, int32_t ihi,
                                 Array1DHandle scale);

/* The real companion matrix whose eigenvalues are the given values: ones above the diagonal and
 * the negated coefficients of the monic polynomial, low power first, in the last row. */
TW_API int32_t CreateMatrixFromEVs_head(Array1DHandle values, Array2DHandle m, int32_t* status);

#endif
