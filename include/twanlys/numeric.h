/* Numerical utilities: integration of sampled data, scaling and vector norms. */
#ifndef TWANLYS_NUMERIC_H
#define TWANLYS_NUMERIC_H

#include "twanlys/types.h"

/* Integration of uniformly sampled data. method: 0 trapezoid, 1 Simpson, 2 Simpson 3/8, 3 Bode;
 * the 1-D _2017 export adds 4 left and 5 right rectangle. Steps are taken by magnitude. The result
 * is NaN on failure. 2-D spacing: the step along a row, then between rows. A 3-D block holds
 * i32 d0, d1, d2, then d2 slabs of d0 rows by d1 columns; its spacing has three steps. */
TW_API int32_t NumerIntegration_head(Array1DHandle x, double* dt, int32_t* method, double* result,
                                     int32_t* status);
TW_API int32_t NumerIntegration_2017_head(Array1DHandle x, double* dt, int32_t* method, double* result);
TW_API int32_t NumerIntegration2D_head(Array2DHandle data, Array1DHandle spacing, uint16_t method,
                                       double* result);
TW_API int32_t NumerIntegration2D_2017_head(Array2DHandle data, Array1DHandle spacing, uint16_t method,
                                            double* result);
TW_API int32_t NumerIntegration3D_head(NumericHandle data, Array1DHandle spacing, uint16_t method,
                                       double* result);
TW_API int32_t NumerIntegration3D_2017_head(NumericHandle data, Array1DHandle spacing, uint16_t method,
                                            double* result);

/* In-place scaling of whole arrays; 2-D exports treat rows * columns elements as one run. On
 * failure the data are emptied and the scalar results are NaN. Status through the last pointer. */
TW_API int32_t Scale(Array2DHandle data, double* offset, double* scale, int32_t* status);
TW_API int32_t Scale1DCIN(Array1DHandle data, double* offset, double* scale, int32_t* status);
TW_API int32_t QScale(Array2DHandle data, double* peak, int32_t* status);
TW_API int32_t QS1D(Array1DHandle data, double* peak, int32_t* status);
/* x * multiplier + offset; note the two argument orders. */
TW_API int32_t Line1(Array1DHandle data, double* offset, double* multiplier, int32_t* status);
TW_API int32_t LinEv(Array2DHandle data, double* multiplier, double* offset, int32_t* status);
/* (x - mean) / deviation with the population deviation. */
TW_API int32_t Norm1(Array1DHandle data, double* deviation, double* mean, int32_t* status);
TW_API int32_t Norm2(Array2DHandle data, double* deviation, double* mean, int32_t* status);
TW_API int32_t RectToPolar1D_head(Array1DHandle x, Array1DHandle y, int32_t* status);
TW_API int32_t PolarToRect1D_head(Array1DHandle magnitude, Array1DHandle phase, int32_t* status);

/* Vector norm of order y (2 where no order is taken), the data scaled to unit norm unless the
 * norm is 0. */
TW_API int32_t unitVector_head(Array1DHandle data, double* norm, int32_t* status);
TW_API int32_t unitVector80_head(Array1DHandle data, double y, double* norm);
TW_API int32_t CxUnitVector_head(Array1DHandle data, double* norm);
TW_API int32_t CxUnitVector80_head(Array1DHandle data, double y, double* norm);

#endif
