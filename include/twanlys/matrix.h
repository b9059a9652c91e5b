/* Matrix frame: products, transposition, trace, norms, rank and condition number.
 * Matrices are 2-D handles of f64 or ComplexDouble elements, row-major. */
#ifndef TWANLYS_MATRIX_H
#define TWANLYS_MATRIX_H

#include <stddef.h>

#include "twanlys/types.h"

/* 0 two-norm, 1 one-norm, 2 Frobenius, 3 infinity norm. */
typedef int32_t MatrixNormType;

TW_API int32_t Transpose_head(Array2DHandle a, Array2DHandle b);
TW_API int32_t CxTranspose_head(Array2DHandle a, Array2DHandle b, int32_t* status);

TW_API int32_t MatrixMul_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t* status);
TW_API int32_t MatrixMulAligned_head(Array2DHandle a, Array2DHandle b, Array2DHandle c,
                                     int32_t privateCopies, int32_t* status);
TW_API int32_t AxBCxCIN(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t* status);
TW_API int32_t AxBCxAlignedCIN(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t privateCopies,
                               int32_t* status);

TW_API int32_t AxVect_head(Array2DHandle a, Array1DHandle x, Array1DHandle y, int32_t* status);
TW_API int32_t AxVectAligned_head(Array2DHandle a, Array1DHandle x, Array1DHandle y, int32_t privateCopies,
                                  int32_t* status);
TW_API int32_t AxVectorCx(Array2DHandle a, Array1DHandle x, Array1DHandle y, int32_t* status);
TW_API int32_t AxVectorCxAligned(Array2DHandle a, Array1DHandle x, Array1DHandle y, int32_t privateCopies,
                                 int32_t* status);
TW_API int32_t vectxA_head(Array1DHandle x, Array2DHandle a, Array1DHandle y);
TW_API int32_t vectxAAligned_head(Array1DHandle x, Array2DHandle a, Array1DHandle y, int32_t privateCopies);
TW_API int32_t CxVectxA_head(Array1DHandle x, Array2DHandle a, Array1DHandle y);
TW_API int32_t CxVectxAAligned_head(Array1DHandle x, Array2DHandle a, Array1DHandle y, int32_t privateCopies);

TW_API int32_t DotProduct_head(Array1DHandle x, Array1DHandle y, double* result, int32_t* status);
TW_API int32_t DotprodCx(Array1DHandle x, Array1DHandle y, ComplexDouble* result, int32_t* status);
TW_API int32_t OuterProd_head(Array1DHandle x, Array1DHandle y, Array2DHandle m, int32_t* status);
TW_API int32_t OuterProdCx_head(Array1DHandle x, Array1DHandle y, Array2DHandle m, int32_t* status);
TW_API int32_t Trace_head(Array2DHandle a, double* result, int32_t* status);
TW_API int32_t CxTrace_head(Array2DHandle a, ComplexDouble* result, int32_t* status);

TW_API int32_t Norm_head(Array2DHandle a, MatrixNormType* type, double* result, int32_t* status);
TW_API int32_t CxNorm_head(Array2DHandle a, MatrixNormType* type, double* result, int32_t* status);
TW_API int32_t vectorNormH(Array1DHandle x, double p, double* result);
TW_API int32_t CxVectorNormH(Array1DHandle x, double p, double* result);
TW_API int32_t Rank_head(Array2DHandle a, double* tol, int32_t* rank, int32_t* status);
TW_API int32_t CxRank_head(Array2DHandle a, double* tol, int32_t* rank, int32_t* status);
TW_API int32_t CondNumber_head(Array2DHandle a, int32_t* type, double* cond, int32_t* status);
TW_API int32_t CxCondNumber_head(Array2DHandle a, int32_t* type, double* cond, int32_t* status);

TW_API int32_t InitialMatrixH(int32_t rows, int32_t cols, Array2DHandle m);
TW_API int32_t CxInitialMatrixH(int32_t rows, int32_t cols, Array2DHandle m);

/* A triangular or symmetric matrix in compact storage, n(n+1)/2 elements by columns of the
 * row-major matrix; kind 0 lower, 1 upper, 2 symmetric (stored as lower). */
#pragma pack(push, 1)
typedef struct {
    Array1DHandle data;
    int32_t kind;
} CompactMatrix;
#pragma pack(pop)

/* 0 Householder, 1 Givens, 2 fast Givens. */
typedef int32_t QrdMethod;
/* 0 full (Q m by m, R m by n), 1 economy, 2 R only. */
typedef int32_t QrOption;
/* 0 none, 1 permute, 2 scale, 3 both. */
typedef int32_t BalanceJob;

TW_API int32_t LU_head(Array2DHandle a, Array1DHandle perm, int32_t* parity, int32_t* status);
TW_API int32_t CxLU_head(Array2DHandle a, Array1DHandle perm, int32_t* parity, int32_t* status);
TW_API int32_t qrd_head(Array2DHandle a, QrdMethod* method, Array2DHandle q, Array2DHandle r, int32_t* status);
TW_API int32_t Cxqrd_head(Array2DHandle a, QrdMethod* method, Array2DHandle q, Array2DHandle r, int32_t* status);
TW_API int32_t QRDecH(Array2DHandle a, int32_t pivot, QrOption option, Array2DHandle p, Array2DHandle q,
                      Array2DHandle r);
TW_API int32_t CxQRDecH(Array2DHandle a, int32_t pivot, QrOption option, Array2DHandle p, Array2DHandle q,
                        Array2DHandle r);
TW_API int32_t Cholesky_head(Array1DHandle compact, int32_t* status);
TW_API int32_t CxCholesky_head(Array1DHandle compact, int32_t* status);
/* The status is stored and also returned. */
TW_API int32_t FullCholesky_head(Array2DHandle a, int32_t* status);
TW_API int32_t CxFullCholesky_head(Array2DHandle a, int32_t* status);
TW_API int32_t GSVD_head(Array2DHandle a, Array2DHandle b, int32_t valuesOnly, int32_t full, Array1DHandle s,
                         Array2DHandle u, Array2DHandle v, Array2DHandle q, Array2DHandle d1, Array2DHandle d2);
TW_API int32_t CxGSVD_head(Array2DHandle a, Array2DHandle b, int32_t valuesOnly, int32_t full, Array1DHandle s,
                           Array2DHandle u, Array2DHandle v, Array2DHandle q, Array2DHandle d1, Array2DHandle d2);
TW_API int32_t Hessenberg_head(Array2DHandle a, int32_t ilo, int32_t ihi, Array2DHandle q);
TW_API int32_t CxHessenberg_head(Array2DHandle a, int32_t ilo, int32_t ihi, Array2DHandle q);
TW_API int32_t MatrixBalance_head(Array2DHandle a, BalanceJob job, int32_t* ilo, int32_t* ihi, Array1DHandle scale);
TW_API int32_t CxMatrixBalance_head(Array2DHandle a, BalanceJob job, int32_t* ilo, int32_t* ihi,
                                    Array1DHandle scale);
TW_API int32_t SVD_head(Array2DHandle a, Array1DHandle s, Array2DHandle v, int32_t* status);
TW_API int32_t CxSVD_head(Array2DHandle a, Array1DHandle s, Array2DHandle v, int32_t* status);
TW_API int32_t SVDEx_head(Array2DHandle a, int32_t full, Array2DHandle u, Array1DHandle s, Array2DHandle v);
TW_API int32_t CxSVDEx_head(Array2DHandle a, int32_t full, Array2DHandle u, Array1DHandle s, Array2DHandle v);
TW_API int32_t SVDS_head(Array2DHandle a, Array1DHandle s, int32_t* status);
TW_API int32_t CxSVDS_head(Array2DHandle a, Array1DHandle s, int32_t* status);
TW_API int32_t Matrix_to_Compact_head(Array2DHandle a, int32_t* kind, Array1DHandle out, int32_t* status);
TW_API int32_t CxMatrix_to_Compact_head(Array2DHandle a, int32_t* kind, Array1DHandle out, int32_t* status);
TW_API int32_t Compact_to_Matrix_head(CompactMatrix* compact, Array2DHandle m, int32_t* status);
TW_API int32_t CxCompact_to_Matrix_head(CompactMatrix* compact, Array2DHandle m, int32_t* status);
TW_API int32_t MatrixToCompact_H(Array2DHandle a, Array1DHandle compact);
TW_API int32_t CompactToMatrix_H(Array2DHandle m, Array1DHandle compact);

/* The LAPACK and CBLAS parameter reports: print one line and return. */
TW_API void xerbla_(const char* name, const int* info, size_t nameLength);
TW_API void cblas_xerbla(int parameter, const char* routine, const char* form, ...);

#endif
