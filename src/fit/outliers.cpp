// Outlier removal: marking samples by value ranges or by number, then copying those that stay.
#include <algorithm>
#include <cmath>

#include "fit/spline.hpp"

namespace tw {

Status ReadOutlierLimits(const double* range, int32_t count, uint32_t selector, OutlierLimits* limits) {
    if (selector > 2) return InvalidSelectorErr;
    const int32_t needed = selector == 2 ? 4 : 2;
    if (count < needed) return selector == 2 ? TooFewSamples4Err : TooFewSamples2Err;
    for (int32_t i = 0; i < needed; ++i)
        if (std::isnan(range[i])) return NanInfErr;
    limits->selector = selector;
    for (int32_t pair = 0; pair < needed / 2; ++pair) {
        // The two limits of a pair may come in either order.
        limits->low[pair] = std::min(range[2 * pair], range[2 * pair + 1]);
        limits->high[pair] = std::max(range[2 * pair], range[2 * pair + 1]);
    }
    return 0;
}

int32_t MarkOutliers(const double* y, const double* x, int32_t n, const OutlierLimits& limits,
                     uint8_t* flags) {
    // Written as tests for staying, so that NaN samples leave.
    const double lo = limits.low[0], hi = limits.high[0];
    int32_t kept = 0;
    for (int32_t i = 0; i < n; ++i) {
        bool stays;
        if (limits.selector == 0) {
            stays = y[i] > lo && y[i] < hi;
        } else {
            stays = x[i] > lo && x[i] < hi;
            // The y test of the joint range keeps a value equal to its high limit.
            if (limits.selector == 2) stays = stays && y[i] > limits.low[1] && y[i] <= limits.high[1];
        }
        flags[i] = stays ? 0 : 1;
        kept += stays ? 1 : 0;
    }
    return kept;
}

Status MarkIndices(const int32_t* list, int32_t count, int32_t n, uint8_t* flags) {
    std::fill(flags, flags + n, uint8_t{0});
    for (int32_t k = 0; k < count; ++k) {
        if (list[k] < 0 || list[k] >= n) return IndexRangeErr;
        flags[list[k]] = 1;
    }
    return 0;
}

void KeepSamples(const double* y, const double* x, const double* w, int32_t n, const uint8_t* flags,
                 double* yKept, double* xKept, double* wKept, int32_t* removed) {
    int32_t k = 0, r = 0;
    for (int32_t i = 0; i < n; ++i) {
        if (flags[i] != 0) {
            if (removed != nullptr) removed[r++] = i;
            continue;
        }
        yKept[k] = y[i];
        xKept[k] = x[i];
        if (w != nullptr && wKept != nullptr) wKept[k] = w[i];
        ++k;
    }
}

}  // namespace tw
