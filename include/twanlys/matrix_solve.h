/* Linear solvers, inverses, pseudo-inverse and determinant. Matrices are 2-D handles of f64 or
 * ComplexDouble elements, row-major; compact triangular matrices as in twanlys/matrix.h. */
#ifndef TWANLYS_MATRIX_SOLVE_H
#define TWANLYS_MATRIX_SOLVE_H

#include "twanlys/matrix.h"
#include "twanlys/types.h"

/* 0 general, 1 positive definite, 2 lower triangular, 3 upper triangular. */
typedef int32_t MatrixType;

/* Least squares through the SVD, minimum-norm where the system is rank deficient. */
TW_API int32_t GenLinEqs_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status);
TW_API int32_t CxGenLinEqs_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status);
TW_API int32_t GenLinEqs82_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, double tol, int32_t* status);
TW_API int32_t CxGenLinEqs82_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, double tol, int32_t* status);
/* work is an output of the size the routine needs; the call makes no other allocation. */
TW_API int32_t GenLinEqs2010_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, double tol, Array1DHandle work);
TW_API int32_t GenLinEqsbySVD2011_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, double tol,
                                       int32_t refinements, Array1DHandle work);
TW_API int32_t EqsSetBySVDDri_head(Array2DHandle a, Array2DHandle b, Array2DHandle x);
TW_API int32_t CxEqsSetBySVDDri_head(Array2DHandle a, Array2DHandle b, Array2DHandle x);
TW_API int32_t EqsSetBySVDDri82_head(Array2DHandle a, Array2DHandle b, Array2DHandle x, double tol);
TW_API int32_t CxEqsSetBySVDDri82_head(Array2DHandle a, Array2DHandle b, Array2DHandle x, double tol);

/* The library's LU. */
TW_API int32_t EqsByLUDri_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status);
TW_API int32_t CxEqsByLUDri_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status);
/* Checks its arguments, then always reports NoSuchCaseErr. */
TW_API int32_t EqsSetByLUDri_head(Array2DHandle a, Array2DHandle b, Array2DHandle x);
TW_API int32_t CxEqsSetByLUDri_head(Array2DHandle a, Array2DHandle b, Array2DHandle x);
TW_API int32_t LULinEqs_head(Array2DHandle lu, Array1DHandle perm, Array1DHandle b, int32_t* status);
TW_API int32_t CxLULinEqs_head(Array2DHandle lu, Array1DHandle perm, Array1DHandle b, int32_t* status);
TW_API int32_t InvMatrixLUDri_head(Array2DHandle a, int32_t* status);
TW_API int32_t CxInvMatrixLUDri_head(Array2DHandle a, int32_t* status);
TW_API int32_t LUInvMatrix_head(Array2DHandle lu, Array1DHandle perm, int32_t* status);
TW_API int32_t CxLUInvMatrix_head(Array2DHandle lu, Array1DHandle perm, int32_t* status);

/* Cholesky: triangle 0 lower, 1 upper. */
TW_API int32_t EqsByCholeskyDri_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status);
TW_API int32_t CxEqsByCholeskyDri_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status);
TW_API int32_t EqsSetByCholeskyDri_head(Array2DHandle a, int32_t triangle, Array2DHandle b, Array2DHandle x);
TW_API int32_t CxEqsSetByCholeskyDri_head(Array2DHandle a, int32_t triangle, Array2DHandle b, Array2DHandle x);
TW_API int32_t CholeskyLinEqs_head(Array1DHandle l, Array1DHandle b, int32_t* status);
TW_API int32_t CxCholeskyLinEqs_head(Array1DHandle l, Array1DHandle b, int32_t* status);
TW_API int32_t InvMatrixChoDri_head(Array2DHandle a, int32_t* status);
TW_API int32_t CxInvMatrixChoDri_head(Array2DHandle a, int32_t* status);
TW_API int32_t Cholesky_InvMatrix_head(Array1DHandle l, int32_t* status);
TW_API int32_t CxCholesky_InvMatrix_head(Array1DHandle l, int32_t* status);
/* The caller sizes everything: work1 n(n+1)/2 elements, work2 n. Nothing is resized, and the
 * matrix is written also when the status is NotPositiveDefiniteErr. */
TW_API int32_t PreallocInvMatrixChoDri_H(Array2DHandle a, Array1DHandle work1, Array1DHandle work2);

/* Triangular: kind 0 lower, 1 upper. */
TW_API int32_t TriLinEqs_head(CompactMatrix* t, Array1DHandle b, int32_t* status);
TW_API int32_t CxTriLinEqs_head(CompactMatrix* t, Array1DHandle b, int32_t* status);
TW_API int32_t TriEqsSetDri_head(Array2DHandle a, int32_t kind, Array2DHandle b, Array2DHandle x);
TW_API int32_t CxTriEqsSetDri_head(Array2DHandle a, int32_t kind, Array2DHandle b, Array2DHandle x);
TW_API int32_t InvMatrixTriDri_head(Array2DHandle a, int32_t* kind, int32_t* status);
TW_API int32_t CxInvMatrixTriDri_head(Array2DHandle a, int32_t* kind, int32_t* status);
TW_API int32_t Tri_InvMatrix_head(CompactMatrix* t, int32_t* status);
TW_API int32_t CxTri_InvMatrix_head(CompactMatrix* t, int32_t* status);

/* Band storage: kl + ku + 1 rows, row ku + i - j holding element (i, j). */
TW_API int32_t BandEqsDriH(Array2DHandle ab, Array1DHandle b, int32_t kl, int32_t ku);
TW_API int32_t CxBandEqsDriH(Array2DHandle ab, Array1DHandle b, int32_t kl, int32_t ku);
TW_API int32_t BandEqsSetDriH(Array2DHandle ab, Array2DHandle b, int32_t kl, int32_t ku);
TW_API int32_t CxBandEqsSetDriH(Array2DHandle ab, Array2DHandle b, int32_t kl, int32_t ku);

/* Tridiagonal LU: ipiv is 1-based, for the solves below. */
TW_API int32_t TriDiagLU_head(Array1DHandle dl, Array1DHandle d, Array1DHandle du, Array1DHandle du2,
                              Array1DHandle ipiv);
TW_API int32_t TriDiagEqsByLU_head(int32_t trans, Array1DHandle dl, Array1DHandle d, Array1DHandle du,
                                   Array1DHandle du2, Array1DHandle ipiv, Array1DHandle b);
TW_API int32_t TriDiagEqsSetByLU_head(int32_t trans, Array1DHandle dl, Array1DHandle d, Array1DHandle du,
                                      Array1DHandle du2, Array1DHandle ipiv, Array2DHandle b);

TW_API int32_t PseudoInverse_head(Array2DHandle a, double* tol, int32_t* status);
TW_API int32_t CxPseudoInverse_head(Array2DHandle a, double* tol, int32_t* status);
TW_API int32_t Determinant_head(Array2DHandle a, MatrixType* type, double* result, int32_t* status);
TW_API int32_t CxDeterminant_head(Array2DHandle a, MatrixType* type, ComplexDouble* result, int32_t* status);

#endif
