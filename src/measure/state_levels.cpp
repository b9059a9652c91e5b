#include "measure/state_levels.hpp"

#include <cmath>

#include "frame/host_link.hpp"
#include "twanlys/link.h"

namespace tw {
namespace {

void ReleaseWorkBins(void* record) {
    auto* b = static_cast<BinBuffer*>(record);
    PlainFree(b->bins);
    PlainFree(b);
}

void MinMax(const double* x, int32_t n, double* mn, double* mx) {
    // NaN samples never win a comparison, so they take no part.
    double lo = INFINITY, hi = -INFINITY;
    for (int32_t i = 0; i < n; ++i) {
        if (x[i] < lo) lo = x[i];
        if (x[i] > hi) hi = x[i];
    }
    *mn = lo;
    *mx = hi;
}

}  // namespace

Status AcquireBins(void** cell, int32_t bins, bool instanceData, int32_t** out) {
    *out = nullptr;
    auto* b = static_cast<BinBuffer*>(*cell);
    if (b == nullptr) {
        b = static_cast<BinBuffer*>(PlainZeroAlloc(sizeof(BinBuffer)));
        if (b == nullptr) return OutOfMemoryErr;
        *cell = b;
        if (!instanceData) HostSetCleanup(&ReleaseWorkBins, b, 2);
    }
    if (b->bins == nullptr || b->size != bins) {
        void* grown = PlainRealloc(b->bins, static_cast<size_t>(bins) * sizeof(int32_t));
        if (grown == nullptr) return OutOfMemoryErr;
        b->bins = static_cast<int32_t*>(grown);
        b->size = bins;
    }
    *out = b->bins;
    return 0;
}

Status HistogramLevels(const double* x, int32_t n, int32_t bins, int32_t* counters, Histogram* h) {
    MinMax(x, n, &h->min, &h->max);
    if (!(h->max - h->min > 0)) return LevelOrderErr;
    const double w = (h->max - h->min) / bins;
    const double r = 1 / w;
    h->width = w;
    for (int32_t k = 0; k < bins; ++k) counters[k] = 0;
    for (int32_t i = 0; i < n; ++i) {
        const double q = (x[i] - h->min) * r;
        // NaN lands in bin 0; the clamp also keeps the conversion defined.
        const int32_t k = !(q >= 0) ? 0 : q >= bins ? bins - 1 : static_cast<int32_t>(q);
        ++counters[k];
    }
    // An empty bin never takes over, so a range with no samples leaves index 0.
    int32_t lowIndex = 0, best = 0;
    for (int32_t k = static_cast<int32_t>(0.4 * bins); k >= 0; --k)
        if (counters[k] > 0 && counters[k] >= best) best = counters[lowIndex = k];
    int32_t highIndex = 0;
    best = 0;
    for (int32_t k = static_cast<int32_t>(0.6 * bins); k < bins; ++k)
        if (counters[k] > 0 && counters[k] >= best) best = counters[highIndex = k];
    h->low = h->min + 0.5 * w + lowIndex * w;
    h->high = h->min + 0.5 * w + highIndex * w;
    h->lowCount = counters[lowIndex];
    h->highCount = counters[highIndex];
    return 0;
}

Status StateLevelsCore(const double* x, double, double dt, int32_t n, int32_t method, int32_t bins,
                       int32_t* counters, int32_t* methodUsed, double* high, double* low, double* amplitude,
                       int32_t strict, double* fullRange) {
    *high = *low = *amplitude = 0;
    *methodUsed = -1;
    if (fullRange != nullptr) *fullRange = 0;
    Status s = 0;
    if (n < 1 || x == nullptr) s = MeasureEmptyWaveformErr;
    else if (!(dt > 0)) s = MeasureDtErr;
    else if (strict != 0 && strict != 1) s = InvalidSelectorErr;
    else if (method < 0 || method > 2) s = HistogramMethodErr;
    if (s < 0) return s;
    double mn, mx;
    MinMax(x, n, &mn, &mx);
    const double t = 0.05 * n;
    Histogram h{};
    if (method == 1) {
        *high = mx;
        *low = mn;
        *methodUsed = 1;
    } else {
        s = HistogramLevels(x, n, bins, counters, &h);
        if (s < 0) return s;
        if (method == 0) {
            *high = h.high;
            *low = h.low;
            *methodUsed = 0;
            if (h.lowCount < t || h.highCount < t) s = StateLevelWeakWarn;
        } else {
            *high = mx;
            *low = mn;
            *methodUsed = 2;
            const bool lowFull = h.lowCount > t, highFull = h.highCount > t;
            if (strict == 0) {
                if (lowFull) *low = h.low;
                if (highFull) *high = h.high;
            } else if (lowFull && highFull) {
                *low = h.low;
                *high = h.high;
                *methodUsed = 0;
            }
        }
    }
    *amplitude = *high - *low;
    if (fullRange != nullptr) *fullRange = mx - mn;
    return s;
}

}  // namespace tw

// An instance-data cell of the measurements holds one bin buffer.
TW_API int32_t MeasurementUnreserveProc(void** cell) {
    if (cell == nullptr || *cell == nullptr) return 0;
    auto* record = static_cast<tw::BinBuffer*>(*cell);
    tw::PlainFree(record->bins);
    record->bins = nullptr;
    record->size = 0;
    tw::PlainFree(record);
    *cell = nullptr;
    return 0;
}
