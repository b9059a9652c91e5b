// Peak detection: a threshold-run finder and a streaming quadratic-fit detector.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// Start indices of the runs of at least `width` samples at or above the threshold; returns the count.
int32_t ThresholdRuns(const double* x, int32_t n, double threshold, int32_t width, int32_t* locations);

// The 3 by width least-squares projection onto (1, t, t^2), t centred on the window.
Status PeakProjection(int32_t width, double* projection);

struct Peak {
    double location, amplitude, secondDerivative;
};

// What a stream carries from block to block besides its tail.
struct PeakScanState {
    int32_t windowsDone;
    int32_t lastSign;
    double* lastCoefficients;  // 3, in caller units
};

// Scans `windows` windows of `width` samples starting at data[0], data[1], ...; peaks found are
// appended to *peaks (a scratch block of *capacity entries, grown by 512). normalise divides each
// window by its extreme on the polarity's side; offset is the mean taken off the data.
Status PeakScan(const double* projection, int32_t width, int32_t polarity, double threshold, const double* data,
                int32_t windows, bool normalise, double offset, double* window, PeakScanState* st, Peak** peaks,
                int32_t* count, int32_t* capacity);

}  // namespace tw
