// State levels of a two-state waveform, and the histogram bin buffer the measurements keep.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// Bin buffer record, as kept in a work cell or in the two slots of an instance-data record (the
// layout MeasurementUnreserveProc frees).
struct BinBuffer {
    int32_t size;
    int32_t* bins;
};

// The bins of *cell, sized to `bins`. Work cells get one host cleanup per record; instance-data
// records are released by MeasurementUnreserveProc instead.
Status AcquireBins(void** cell, int32_t bins, bool instanceData, int32_t** out);

// The levels of the histogram of x with `bins` bins.
struct Histogram {
    double min, max, width;
    double low, high;       // bin centres
    int32_t lowCount, highCount;
};
Status HistogramLevels(const double* x, int32_t n, int32_t bins, int32_t* counters, Histogram* h);

// Methods: 0 histogram, 1 peak values, 2 histogram with fallback to peak values. fullRange
// (max - min whatever the method) may be null. A weak histogram is StateLevelWeakWarn.
Status StateLevelsCore(const double* x, double t0, double dt, int32_t n, int32_t method, int32_t bins,
                       int32_t* counters, int32_t* methodUsed, double* high, double* low, double* amplitude,
                       int32_t strict, double* fullRange);

}  // namespace tw
