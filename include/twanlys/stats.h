/* Descriptive statistics. */
#ifndef TWANLYS_STATS_H
#define TWANLYS_STATS_H

#include "twanlys/types.h"

/* One interval of GenHistH, packed to 20 bytes. type 0: [low, high), 1: (low, high],
 * 2: [low, high], 3: (low, high), other: everything lies inside. */
#pragma pack(push, 1)
typedef struct {
    double low;
    double high;
    int32_t type;
} HistogramInterval;

/* Values outside every interval: total, below the first, above the last. */
typedef struct {
    int32_t total;
    int32_t below;
    int32_t above;
} HistogramOutside;
#pragma pack(pop)

TW_API int32_t Mean_head(Array1DHandle x, double* mean, int32_t* status);
TW_API int32_t RMS_head(Array1DHandle x, double* rms, int32_t* status);
TW_API int32_t CxRMS_head(Array1DHandle x, double* rms);
TW_API int32_t MSE_head(Array1DHandle x, Array1DHandle y, double* mse, int32_t* status);
TW_API int32_t Median_head(Array1DHandle x, double* median, int32_t* status);
TW_API int32_t Moment_head(Array1DHandle x, int32_t* order, double* moment, int32_t* status);
TW_API int32_t ModeH(Array1DHandle x, int32_t intervals, Array1DHandle modes);
TW_API int32_t histgran_head(Array1DHandle x, int32_t* bins, Array1DHandle counts,
                             Array1DHandle centres, int32_t* status);
TW_API int32_t GenHistH(Array1DHandle x, Array1DHandle intervals, Array1DHandle counts,
                        HistogramOutside* outside, int32_t* status);

#endif
