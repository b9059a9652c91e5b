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

/* The real companion matrix whose eigenvalues are the given values: ones above the diagonal and
 * the negated coefficients of the monic polynomial, low power first, in the last row. */
TW_API int32_t CreateMatrixFromEVs_head(Array1DHandle values, Array2DHandle m, int32_t* status);

#endif
