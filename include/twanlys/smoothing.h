/* Smoothing filters: Savitzky-Golay least-squares polynomial smoothing and a running median. */
#ifndef TWANLYS_SMOOTHING_H
#define TWANLYS_SMOOTHING_H

#include "twanlys/types.h"

/* Savitzky-Golay design for an odd frame above order >= 1. weights is empty or holds frame
 * entries, used by magnitude. H (frame by frame): row i gives the smoothed value at frame position
 * i from the frame's samples. K (order + 1 by frame), resized and written only when
 * wantDerivatives is non-zero: row r gives the least-squares coefficient of t^r at the centre, so
 * r! times it gives the r-th derivative. */
TW_API int32_t SavitzkyGolayCoefH(int32_t order, int32_t frame, Array1DHandle weights, int32_t wantDerivatives,
                                  Array2DHandle H, Array2DHandle K);
/* Smooths x (at least frame samples) into y; the first and last half frames are the polynomial
 * fits of the first and last frames evaluated there, without padding. */
TW_API int32_t SavitzkyGolayFiltH(Array1DHandle x, int32_t order, int32_t frame, Array1DHandle weights,
                                  Array1DHandle y);

/* Running median in place over left + 1 + right samples, the signal being 0 outside x; an even
 * window averages its two middle values. MedianFilterCIN uses left = right = *halfWidth and
 * returns its status through the pointer; MedianFilter81_H takes a negative right as right = left.
 * Needs left >= 0 and right below the length of a non-empty x. */
TW_API int32_t MedianFilterCIN(Array1DHandle x, int32_t* halfWidth, int32_t* status);
TW_API int32_t MedianFilter81_H(Array1DHandle x, int32_t left, int32_t right);

#endif
