#include <cmath>

#include "signal/triggers.hpp"

namespace tw {

namespace {

constexpr int kBins = 101;

// The pulse seen with a sign, so that a negative pulse is measured as the mirror of a positive
// one without copying it.
struct Signed {
    const double* x;
    double sign;
    double operator[](int32_t i) const { return sign * x[i]; }

    // Where the line through samples i-1 and i meets l; index 0 has no predecessor and gives 0.
    double Cross(int32_t i, double l) const {
        if (i == 0) return 0.0;
        return i - ((*this)[i] - l) / ((*this)[i] - (*this)[i - 1]);
    }
};

}  // namespace

PulseResults MeasurePulse(const double* x, int32_t n) {
    PulseResults r{};
    double mn = x[0], mx = x[0];
    for (int32_t i = 1; i < n; ++i) {
        if (x[i] < mn) mn = x[i];
        if (x[i] > mx) mx = x[i];
    }
    if (mn == mx) {
        r.top = r.base = x[0];
        return r;
    }
    const double range = mx - mn;
    int32_t counts[kBins] = {};
    for (int32_t i = 0; i < n; ++i) {
        const double b = std::trunc(kBins * (x[i] - mn) / range);
        if (!(b >= 0)) continue;  // NaN
        counts[b >= kBins - 1 ? kBins - 1 : static_cast<int>(b)] += 1;
    }
    // The two scans meet in the middle; the middle bin belongs to the top's scan.
    int lowBin = 0, highBin = kBins - 1, best = -1;
    for (int k = 0; k < kBins / 2; ++k)
        if (counts[k] > best) {
            best = counts[k];
            lowBin = k;
        }
    best = -1;
    for (int k = kBins - 1; k >= kBins / 2; --k)
        if (counts[k] > best) {
            best = counts[k];
            highBin = k;
        }
    const double base = mn + (lowBin + 0.5) * range / kBins;
    const double top = mn + (highBin + 0.5) * range / kBins;
    double amplitude = top - base;
    r.overshoot = mx - top;
    r.undershoot = base - mn;

    double l10 = 0.1 * amplitude + base, l50 = 0.5 * amplitude + base, l90 = 0.9 * amplitude + base;
    Signed s{x, 1.0};
    r.top = top;
    r.base = base;
    if (x[0] > l50) {
        // A negative pulse: the levels of the swapped pair, negated with the data.
        amplitude = -amplitude;
        r.top = base;
        r.base = top;
        l10 = -(0.1 * amplitude + r.base);
        l50 = -(0.5 * amplitude + r.base);
        l90 = -(0.9 * amplitude + r.base);
        s.sign = -1.0;
    }
    r.amplitude = amplitude;

    const double last = n - 1;
    int32_t i = 0, lo = -1, hi = -1;
    for (; i < n && !(s[i] >= l50); ++i)
        if (s[i] < l10) lo = i;
    r.delay = i < n ? s.Cross(i, l50) : last;

    for (; i < n && !(s[i] >= l90); ++i) {
    }
    if (i < n)
        r.rise = lo + 1 < n ? s.Cross(i, l90) - s.Cross(lo + 1, l10) : s.Cross(i, l90) - lo + 1;
    else
        r.rise = last - lo + 1;

    for (; i < n && !(s[i] <= l50); ++i)
        if (s[i] > l90) hi = i;
    r.width = (i < n ? s.Cross(i, l50) : last) - r.delay;

    for (; i < n && !(s[i] <= l10); ++i) {
    }
    if (i < n)
        r.fall = hi + 1 < n ? s.Cross(i, l10) - s.Cross(hi + 1, l90) : s.Cross(i, l10) - hi + 1;
    else
        r.fall = last - hi + 1;

    r.slew = r.rise == 0 ? 1e+30 : amplitude * 0.8 / r.rise;
    return r;
}

}  // namespace tw
