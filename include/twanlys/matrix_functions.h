/* Functions of a square matrix, characteristic polynomial, Kronecker product, generated matrices,
 * the autocorrelation matrix, symmetry and definiteness checks, and the Sylvester and Lyapunov
 * equations. Matrices are 2-D handles of f64 or ComplexDouble elements, row-major. */
#ifndef TWANLYS_MATRIX_FUNCTIONS_H
#define TWANLYS_MATRIX_FUNCTIONS_H

#include "twanlys/types.h"

/* 0 identity, 1 diagonal, 2 Toeplitz, 3 Vandermonde, 4 companion. */
typedef int32_t SpecialMatrixType;
/* 0 full, 1 pre-windowed, 2 post-windowed, 3 covariance, 4 modified covariance. */
typedef int32_t AutoCorrType;
/* 0 general matrices, reduced to Schur form first; 1 already upper quasi-triangular. */
typedef int32_t MatrixForm;
/* 0 continuous A X + X A^T = scale Q, 1 discrete A X A^T - X = scale Q. */
typedef int32_t LyapunovType;

/* Exponential, logarithm, square root and integer power. Warnings (+20006, and +20003 when the
 * logarithm took its fallback after a zero eigenvalue) keep the result. The real logarithm and
 * MatrixSqrtH give the complex principal result in b; MatrixSqrt_head keeps its real parts. */
TW_API int32_t MatrixExp_head(Array2DHandle a, int32_t* status);
TW_API int32_t CxMatrixExp_head(Array2DHandle a, int32_t* status);
TW_API int32_t MatrixLn_head(Array2DHandle a, Array2DHandle b, int32_t* status);
TW_API int32_t CxMatrixLn_head(Array2DHandle a, int32_t* status);
TW_API int32_t MatrixSqrt_head(Array2DHandle a, int32_t* status);
TW_API int32_t MatrixSqrtH(Array2DHandle a, Array2DHandle b);
TW_API int32_t CxMatrixSqrt_head(Array2DHandle a, int32_t* status);
/* A negative power raises the pseudo-inverse. */
TW_API int32_t MatrixPower_head(Array2DHandle a, int32_t power);
TW_API int32_t CxMatrixPower_head(Array2DHandle a, int32_t power);

/* det(zI - A), n + 1 coefficients low power first. */
TW_API int32_t MatrixCharacteristicPoly_head(Array2DHandle a, Array1DHandle c, int32_t* status);
TW_API int32_t CxMatrixCharacteristicPoly_head(Array2DHandle a, Array1DHandle c);
/* C[i p + r][j q + s] = A[i][j] B[r][s] for A m by n and B p by q. */
TW_API int32_t KroneckerProd_H(Array2DHandle a, Array2DHandle b, Array2DHandle c);
TW_API int32_t CxKroneckerProd_H(Array2DHandle a, Array2DHandle b, Array2DHandle c);
/* size is read for the identity only; Toeplitz rows start x[i], ..., x[0], y[1], ... */
TW_API int32_t SpecialMatrix_head(SpecialMatrixType* type, int32_t* size, Array1DHandle x, Array1DHandle y,
                                  Array2DHandle m, int32_t* status);
TW_API int32_t CxSpecialMatrix_head(SpecialMatrixType* type, int32_t* size, Array1DHandle x, Array1DHandle y,
                                    Array2DHandle m, int32_t* status);
/* Autocorrelation matrix of order m, r = X^H X, X the scaled data matrix of the type. With *count
 * above 0 (and *reset 0) the block continues the record: prev holds its last m samples, r is
 * updated to the running estimate and X holds the rows of the new block; *count grows by the
 * length of x and prev receives the last m samples. */
TW_API int32_t AutoCorrMtrxH(Array1DHandle x, Array1DHandle prev, Array2DHandle r, Array2DHandle xm, int32_t m,
                             AutoCorrType type, int32_t* count, int32_t* reset);
TW_API int32_t CxAutoCorrMtrxH(Array1DHandle x, Array1DHandle prev, Array2DHandle r, Array2DHandle xm, int32_t m,
                               AutoCorrType type, int32_t* count, int32_t* reset);

/* Checks; *result 1 or 0, A is not changed. */
TW_API int32_t CheckSym_head(Array2DHandle a, double tol, int32_t relative, int32_t* result);
TW_API int32_t CxCheckSym_head(Array2DHandle a, double tol, int32_t relative, int32_t hermitian, int32_t* result);
TW_API int32_t CheckPosdef_head(Array2DHandle a, int32_t* result, int32_t* status);
TW_API int32_t CxCheckPosdef_head(Array2DHandle a, int32_t* result, int32_t* status);
TW_API int32_t CheckPosSemiDef_head(Array2DHandle a, double tol, int32_t* result, int32_t* rank);
TW_API int32_t CxCheckPosSemiDef_head(Array2DHandle a, double tol, int32_t* result, int32_t* rank);

/* Lyapunov equations; X replaces Q. *scale is 1.0 on failure. The complex form 0 returns X^H. */
TW_API int32_t Lyapunov_head(Array2DHandle a, Array2DHandle q, MatrixForm form, double* scale);
TW_API int32_t CxLyapunov_head(Array2DHandle a, Array2DHandle q, MatrixForm form, double* scale);
TW_API int32_t Lyapunov85_head(Array2DHandle a, Array2DHandle q, MatrixForm form, LyapunovType type, double* scale);
TW_API int32_t CxLyapunov85_head(Array2DHandle a, Array2DHandle q, MatrixForm form, LyapunovType type,
                                 double* scale);
/* op(A) X + sign X op(B) = scale C, op selected by 0 (none) or 1 (transpose; complex: conjugate
 * transpose); X replaces C. Sylvester_head expects quasi-triangular A and B. *perturbed is 1 when
 * close eigenvalues sent the solve to its least-squares fallback. */
TW_API int32_t Sylvester_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t transA, int32_t transB,
                              int32_t sign, double* scale, int32_t* perturbed);
TW_API int32_t CxSylvester_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t transA, int32_t transB,
                                int32_t sign, double* scale, int32_t* perturbed);
TW_API int32_t Sylvester81_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t transA, int32_t transB,
                                int32_t sign, MatrixForm form, double* scale, int32_t* perturbed);
TW_API int32_t CxSylvester81_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t transA, int32_t transB,
                                  int32_t sign, MatrixForm form, double* scale, int32_t* perturbed);

#endif
