#include "signal/resample.hpp"

#include <algorithm>
#include <cmath>

namespace tw {

Status PlanRationalBlock(int32_t n, int32_t stateCount, int32_t l, int32_t m, int32_t taps, int32_t delay,
                         int32_t cells, RationalPlan* plan) {
    const int64_t c = (taps - 1) / 2, total = int64_t{stateCount} + n;
    const int64_t bracket = total * l - c - delay - 1;
    const int64_t count = bracket >= 0 ? bracket / m + 1 : 0;
    if (count > INT32_MAX) return OutOfMemoryErr;
    const int64_t next = delay + count * m;
    int64_t drop = 0;
    // With nothing to output, live state waits whole for more samples.
    if (count > 0 || stateCount == 0) {
        const int64_t q = next - c - 1;
        drop = q < 0 ? 0 : q / l + 1;
        // Only samples in hand can go, and none at or after the next instant: with taps below
        // 2 l - 1 the first sample the next output needs can lie past that instant, and
        // dropping up to it would leave a negative delay that the next block refuses.
        drop = std::min({drop, next / l, total});
    }
    const int64_t keep = total - drop;
    if (keep > cells) return DomainSingularityErr;
    *plan = {static_cast<int32_t>(count), drop, static_cast<int32_t>(keep),
             static_cast<int32_t>(next - drop * l)};
    return 0;
}

void PolyphaseSplit(const double* h, int32_t taps, int32_t l, double* poly, int32_t* start) {
    const int32_t phases = std::min(l, taps);
    int32_t at = 0;
    for (int32_t p = 0; p < phases; ++p) {
        start[p] = at;
        for (int64_t j = p; j < taps; j += l) poly[at++] = h[j];
    }
    start[phases] = at;
}

template <class T>
void RationalFilter(const T* v, const double* poly, const int32_t* start, int32_t taps, int32_t l, int32_t m,
                    int32_t delay, int32_t count, T* y) {
    const int64_t c = (taps - 1) / 2, phases = std::min(l, taps);
    const double gain = l;
    int64_t t = delay;
    for (int32_t k = 0; k < count; ++k, t += m) {
        const int64_t q = t - c - 1;
        const int64_t i0 = q < 0 ? 0 : q / l + 1;
        const int64_t j0 = i0 * l - t + c, p = j0 % l;
        T sum{};
        if (p < phases) {
            const double* hp = poly + start[p] + j0 / l;
            const int64_t terms = poly + start[p + 1] - hp;
            const T* vp = v + i0;
            for (int64_t j = 0; j < terms; ++j) sum += hp[j] * vp[j];
        }
        y[k] = gain * sum;
    }
}

#define TW_RATIONAL(T)                                                                                  \
    template void RationalFilter<T>(const T*, const double*, const int32_t*, int32_t, int32_t, int32_t, \
                                    int32_t, int32_t, T*);
TW_RATIONAL(double)
TW_RATIONAL(cdouble)
#undef TW_RATIONAL

}  // namespace tw
