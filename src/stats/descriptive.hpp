// Descriptive statistics on plain arrays.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

Status Mean(const double* x, int32_t n, double* mean);
Status Rms(const double* x, int32_t n, double* rms);
Status CxRms(const cdouble* x, int32_t n, double* rms);
// Over the first min(nx, ny) pairs; LengthsDifferWarn when the lengths differ.
Status MeanSquaredError(const double* x, int32_t nx, const double* y, int32_t ny, double* mse);
Status Median(const double* x, int32_t n, double* median);
Status CentralMoment(const double* x, int32_t n, int32_t order, double* moment);

// Equal-width histogram of bins bins over [low, high]; the top edge belongs to the last bin.
Status Histogram(const double* x, int32_t n, double low, double high, int32_t bins, int32_t* counts,
                 double* centres);

// The same over [min x, max x].
Status DataHistogram(const double* x, int32_t n, int32_t bins, int32_t* counts, double* centres);

// Modes of x: binned over `intervals` bins when intervals >= 1, exact values otherwise. modes
// must hold ModeCapacity(n, intervals) values; *count is 0 when there is no mode.
int64_t ModeCapacity(int32_t n, int32_t intervals);
Status Mode(const double* x, int32_t n, int32_t intervals, double* modes, int32_t* count);

struct Interval {
    double low;
    double high;
    int32_t type;
};
struct OutsideCounts {
    int32_t total;
    int32_t below;
    int32_t above;
};

// Counts each value in every interval that holds it; counts and outside are zeroed first.
void GeneralHistogram(const double* x, int32_t n, const Interval* intervals, int32_t m,
                      int32_t* counts, OutsideCounts* outside);

}  // namespace tw
