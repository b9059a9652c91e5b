#include "stats/descriptive.hpp"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <utility>

namespace tw {
namespace {

// Equality of the mode search: relative to the earlier value, so near 0 only exact ties count.
constexpr double kModeEps = 2.220446049250313e-16;
bool ModeEqual(double a, double b) { return std::fabs(a - b) <= std::fabs(a) * kModeEps; }

double SumOfSquares(const double* x, int32_t n) {
    double sum = 0.0;
    for (int32_t i = 0; i < n; ++i) sum += x[i] * x[i];
    return sum;
}

// Brings the k-th smallest element to a[k]: quick-select with median-of-three pivoting and a
// Hoare scan. Elements below k end up not greater than a[k].
double Select(double* a, int32_t n, int32_t k) {
    int32_t left = 0, right = n - 1;
    for (;;) {
        if (right <= left + 1) {
            if (right == left + 1 && a[right] < a[left]) std::swap(a[left], a[right]);
            return a[k];
        }
        const int32_t mid = (left + right) / 2;
        std::swap(a[mid], a[left + 1]);
        if (a[left] > a[right]) std::swap(a[left], a[right]);
        if (a[left + 1] > a[right]) std::swap(a[left + 1], a[right]);
        if (a[left] > a[left + 1]) std::swap(a[left], a[left + 1]);
        int32_t i = left + 1, j = right;
        const double pivot = a[left + 1];
        for (;;) {
            do ++i; while (a[i] < pivot);
            do --j; while (a[j] > pivot);
            if (j < i) break;
            std::swap(a[i], a[j]);
        }
        a[left + 1] = a[j];
        a[j] = pivot;
        if (j >= k) right = j - 1;
        if (j <= k) left = i;
    }
}

// d to the power order (order >= 1) by repeated squaring, low bits first.
double IntegerPower(double d, int32_t order) {
    uint32_t p = static_cast<uint32_t>(order);
    while ((p & 1u) == 0) {
        d *= d;
        p >>= 1;
    }
    double r = d;
    while ((p >>= 1) != 0) {
        d *= d;
        if (p & 1u) r *= d;
    }
    return r;
}

// Position of x against one interval: 0 inside, -1 below, +1 above (NaN lies above).
int Locate(const Interval& iv, double x) {
    switch (iv.type) {
        case 0: return (iv.low <= x && x < iv.high) ? 0 : (x < iv.low ? -1 : 1);
        case 1: return (iv.low < x && x <= iv.high) ? 0 : (x <= iv.low ? -1 : 1);
        case 2: return (iv.low <= x && x <= iv.high) ? 0 : (x < iv.low ? -1 : 1);
        case 3: return (iv.low < x && x < iv.high) ? 0 : (x <= iv.low ? -1 : 1);
        default: return 0;
    }
}

int32_t BinnedModes(const double* x, int32_t n, int32_t intervals, double* modes, Status* status) {
    double hi = kNaN, lo = kNaN;
    for (int32_t i = 0; i < n; ++i) {
        if (std::isnan(x[i])) continue;
        if (std::isnan(hi) || x[i] > hi) hi = x[i];
        if (std::isnan(lo) || x[i] < lo) lo = x[i];
    }
    if (std::fabs(hi - lo) <= std::fabs(hi) * kModeEps) {
        modes[0] = hi;
        return 1;
    }
    Scratch<int32_t> counts;
    Scratch<double> centres;
    if ((*status = counts.Allocate(static_cast<size_t>(intervals))) != 0) return 0;
    if ((*status = centres.Allocate(static_cast<size_t>(intervals))) != 0) return 0;
    if ((*status = Histogram(x, n, lo, hi, intervals, counts.get(), centres.get())) != 0) return 0;
    int32_t best = counts[0], found = 1;
    modes[0] = centres[0];
    for (int32_t i = 1; i < intervals; ++i) {
        if (counts[i] > best) {
            best = counts[i];
            found = 0;
        }
        if (counts[i] == best) modes[found++] = centres[i];
    }
    *status = MergeRelease(MergeRelease(0, counts.Release()), centres.Release());
    return best < 2 ? 0 : found;
}

int32_t ExactModes(const double* x, int32_t n, double* modes, Status* status) {
    Scratch<double> sorted;
    if ((*status = sorted.Allocate(static_cast<size_t>(n))) != 0) return 0;
    double* s = sorted.get();
    std::memcpy(s, x, static_cast<size_t>(n) * sizeof(double));
    double* numbers = std::stable_partition(s, s + n, [](double v) { return std::isnan(v); });
    std::sort(numbers, s + n);
    if (std::fabs(s[0] - s[n - 1]) <= std::fabs(s[0]) * kModeEps) {
        modes[0] = s[0];
        return 1;
    }
    int32_t best = 1, found = 0;
    for (int32_t i = 0; i < n;) {
        int32_t j = i + 1;
        while (j < n && ModeEqual(s[i], s[j])) ++j;
        const int32_t run = j - i;
        if (run > 1 && run >= best) {
            if (run > best) found = 0;
            best = run;
            modes[found++] = s[i];
        }
        i = j;
    }
    *status = sorted.Release();
    return best < 2 ? 0 : found;
}

}  // namespace

Status Mean(const double* x, int32_t n, double* mean) {
    if (n < 1) return EmptyArrayErr;
    double sum = 0.0;
    for (int32_t i = 0; i < n; ++i) sum += x[i];
    *mean = sum / n;
    return 0;
}

Status Rms(const double* x, int32_t n, double* rms) {
    if (n < 1) return EmptyArrayErr;
    *rms = std::sqrt(SumOfSquares(x, n) / n);
    return 0;
}

Status CxRms(const cdouble* x, int32_t n, double* rms) {
    if (n < 1) return EmptyArrayErr;
    double sum = 0.0;
    for (int32_t i = 0; i < n; ++i) sum += x[i].real() * x[i].real() + x[i].imag() * x[i].imag();
    *rms = std::sqrt(sum / n);
    return 0;
}

Status MeanSquaredError(const double* x, int32_t nx, const double* y, int32_t ny, double* mse) {
    if (nx < 1 || ny < 1) return EmptyArrayErr;
    const int32_t m = std::min(nx, ny);
    // The expanded square is deliberate: its rounding is part of the result.
    double sum = 0.0;
    for (int32_t i = 0; i < m; ++i) sum += (y[i] - (x[i] + x[i])) * y[i] + x[i] * x[i];
    *mse = sum / m;
    return nx != ny ? LengthsDifferWarn : 0;
}

Status Median(const double* x, int32_t n, double* median) {
    if (n < 1) return EmptyArrayErr;
    for (int32_t i = 0; i < n; ++i)
        if (std::isnan(x[i])) return BoundsNanErr;
    Scratch<double> copy;
    if (const Status s = copy.Allocate(static_cast<size_t>(n))) return s;
    double* a = copy.get();
    std::memcpy(a, x, static_cast<size_t>(n) * sizeof(double));
    const int32_t k = n / 2;
    const double upper = Select(a, n, k);
    if (n % 2 == 1) {
        *median = upper;
    } else {
        double lower = a[0];
        for (int32_t i = 1; i < k; ++i)
            if (a[i] > lower) lower = a[i];
        *median = (lower + upper) * 0.5;
    }
    return copy.Release();
}

Status CentralMoment(const double* x, int32_t n, int32_t order, double* moment) {
    if (n < 1) return EmptyArrayErr;
    if (order < 1) return OrderNotPositiveErr;
    double mean;
    Mean(x, n, &mean);
    double sum = 0.0;
    for (int32_t i = 0; i < n; ++i) sum += IntegerPower(x[i] - mean, order);
    *moment = sum / n;
    return 0;
}

Status Histogram(const double* x, int32_t n, double low, double high, int32_t bins, int32_t* counts,
                 double* centres) {
    if (low > high) return IntervalOrderErr;
    if (n < 1 || bins < 1) return EmptyArrayErr;
    std::fill(counts, counts + bins, 0);
    if (low == high) {
        std::fill(centres, centres + bins, low);
        counts[bins - 1] = n;
        return 0;
    }
    const double range = high - low;
    const double width = range / bins;
    double c = low + 0.5 * width;
    for (int32_t i = 0; i < bins; ++i, c += width) centres[i] = c;
    const double scale = bins / range;
    for (int32_t i = 0; i < n; ++i) {
        const double index = std::floor((x[i] - low) * scale);
        if (index >= 0 && index < bins)
            ++counts[static_cast<int32_t>(index)];
        else if (x[i] == high)
            ++counts[bins - 1];
    }
    return 0;
}

Status DataHistogram(const double* x, int32_t n, int32_t bins, int32_t* counts, double* centres) {
    if (n < 1 || bins < 1) return EmptyArrayErr;
    // Both extremes start from x[0]; a NaN after it cannot displace them.
    double lo = x[0], hi = x[0];
    for (int32_t i = 1; i < n; ++i) {
        if (lo > x[i])
            lo = x[i];
        else if (hi < x[i])
            hi = x[i];
    }
    return Histogram(x, n, lo, hi, bins, counts, centres);
}

int64_t ModeCapacity(int32_t n, int32_t intervals) { return intervals >= 1 ? intervals : n; }

Status Mode(const double* x, int32_t n, int32_t intervals, double* modes, int32_t* count) {
    *count = 0;
    if (n < 1) return EmptyArrayErr;
    if (n == 1) return 0;
    Status s = 0;
    *count = intervals >= 1 ? BinnedModes(x, n, intervals, modes, &s) : ExactModes(x, n, modes, &s);
    if (s < 0) *count = 0;
    return s;
}

void GeneralHistogram(const double* x, int32_t n, const Interval* intervals, int32_t m,
                      int32_t* counts, OutsideCounts* outside) {
    *outside = {0, 0, 0};
    std::fill(counts, counts + m, 0);
    for (int32_t k = 0; k < n; ++k) {
        bool inside = false;
        for (int32_t i = 0; i < m; ++i) {
            const int where = Locate(intervals[i], x[k]);
            if (where == 0) {
                ++counts[i];
                inside = true;
            } else if (i == 0 && where < 0) {
                // The first interval is taken to be the lowest: nothing later is tested.
                ++outside->total;
                ++outside->below;
                break;
            }
            if (i == m - 1 && !inside && where != 0) {
                ++outside->total;
                if (where > 0) ++outside->above;
            }
        }
    }
}

}  // namespace tw
