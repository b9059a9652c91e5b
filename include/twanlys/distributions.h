/* Distribution functions of the normal, Student t, F and chi-square laws and their inverses.
 * Every argument is passed by pointer; the status goes through the last argument (NormDist_head
 * has none) and a failed call leaves NaN as its result. The normal pair are short rational
 * approximations (errors about 1e-5 and 4.5e-4); the t, F and chi-square inverses are bisections
 * to a bracket width of 1e-4 and return the lower end of the final bracket. */
#ifndef TWANLYS_DISTRIBUTIONS_H
#define TWANLYS_DISTRIBUTIONS_H

#include "twanlys/types.h"

TW_API int32_t NormDist_head(const double* x, double* p);
TW_API int32_t InvNdist_head(const double* p, double* x, int32_t* status);
TW_API int32_t TDist_head(const double* t, const int32_t* df, double* p, int32_t* status);
TW_API int32_t InvTdist_head(const double* p, const int32_t* df, double* t, int32_t* status);
TW_API int32_t FDist_head(const double* f, const int32_t* numeratorDf, const int32_t* denominatorDf,
                          double* p, int32_t* status);
TW_API int32_t InvFDist_head(const double* p, const int32_t* numeratorDf, const int32_t* denominatorDf,
                             double* f, int32_t* status);
TW_API int32_t ChiSquare_head(const double* x, const int32_t* df, double* p, int32_t* status);
TW_API int32_t InvChiSquare_head(const double* p, const int32_t* df, double* x, int32_t* status);

#endif
