#include "measure/pulse.hpp"

#include <algorithm>
#include <cmath>

#include "measure/state_levels.hpp"

namespace tw {
namespace {

// State levels as a transition needs them.
struct StateInfo {
    int32_t methodUsed;
    double high, low, amplitude, fullRange;
};

// Number, waveform and reference checks shared by the three cores; converts percent references
// to absolute ones. Returns StateLevelWeakWarn when the conversion rested on a weak histogram.
Status ResolveLevels(const double* x, int32_t n, double t0, double dt, int32_t number, References* r,
                     const LevelSettings& ls, bool alwaysLevels, StateInfo* st, double* h) {
    if (number < 1) return MeasureEmptyErr;
    if (n < 1 || x == nullptr) return MeasureEmptyWaveformErr;
    if (!(dt > 0)) return MeasureDtErr;
    Status weak = 0;
    if (r->units != 0 || alwaysLevels) {
        const Status s = StateLevelsCore(x, t0, dt, n, ls.method, ls.bins, ls.counters, &st->methodUsed,
                                         &st->high, &st->low, &st->amplitude, ls.strict, &st->fullRange);
        if (s < 0) return s;
        weak = s;
        if (r->units != 0) {
            r->high = r->high * st->amplitude / 100 + st->low;
            r->mid = r->mid * st->amplitude / 100 + st->low;
            r->low = r->low * st->amplitude / 100 + st->low;
        }
    }
    *h = std::min(r->mid - r->low, r->high - r->mid);
    if (*h < 0) return ReferenceOrderErr;
    return weak;
}

Status Worse(Status a, Status b) { return a < 0 ? a : b < 0 ? b : a != 0 ? a : b; }

double Between(const double* x, int32_t i, double level) {
    double d = x[i] - x[i + 1];
    if (d == 0) d = 1;
    return i + (x[i] - level) / d;
}

}  // namespace

Status ReferenceLevels(const double* x, int32_t n, double t0, double dt, References* refs, const LevelSettings& ls,
                       double* hysteresis) {
    StateInfo st{};
    return ResolveLevels(x, n, t0, dt, 1, refs, ls, false, &st, hysteresis);
}

int32_t FindCrossings(const double* x, int32_t n, double t0, double mid, double h, bool startArmed,
                      Crossing* list, int32_t capacity) {
    int32_t count = 0;
    int32_t s = 2;
    bool armed = startArmed;
    for (int32_t i = 0; i + 1 < n && count < capacity; ++i) {
        const double v = x[i];
        if (v >= mid + h && s != 0) {
            s = 0;
            armed = true;
        } else if (v <= mid - h && s != 1) {
            s = 1;
            armed = true;
        }
        if (!armed || !((x[i] - mid) * (x[i + 1] - mid) <= 0)) continue;
        if (startArmed && x[i + 1] == x[i]) continue;
        if (startArmed && s == 2) s = x[i + 1] > x[i] ? 1 : 0;
        list[count++] = {Between(x, i, mid) + t0, s, i + 1};
        armed = false;
    }
    return count;
}

Status PulseCore(const double* x, int32_t n, double t0, double dt, int32_t polarity, bool unbounded,
                 int32_t number, References* refs, const LevelSettings& ls, PulseResult* out) {
    *out = {};
    StateInfo st{};
    double h = 0;
    Status s = ResolveLevels(x, n, t0, dt, number, refs, ls, false, &st, &h);
    if (s < 0) {
        *refs = {0, 0, 0, refs->units};
        return s;
    }
    const int64_t wanted = 2 * int64_t{number} + 1;
    // No more crossings than sample gaps can exist, which bounds the list.
    const int32_t capacity = static_cast<int32_t>(std::min<int64_t>(wanted, n));
    Scratch<Crossing> list;
    Status fail = 0;
    if (list.Allocate(static_cast<size_t>(capacity)) != 0) fail = MeasureNoMemoryErr;
    int32_t found = 0;
    if (fail == 0) {
        found = FindCrossings(x, n, t0, refs->mid, h, false, list.get(), capacity);
        if (found < wanted && (!unbounded || found < wanted - 1 ||
                               (found > 0 && list[static_cast<size_t>(found - 1)].direction == polarity)))
            fail = SlewRegionTooShortErr;
    }
    int32_t first = -1;
    if (fail == 0) {
        if (polarity == -1) {
            first = 2 * number - 2;
        } else {
            for (int32_t i = 0, seen = 0; i < found; ++i)
                if (list[static_cast<size_t>(i)].direction == polarity && ++seen == number) {
                    first = i;
                    break;
                }
        }
        if (first < 0 || first + 1 >= found) fail = SlewRegionTooShortErr;
    }
    if (fail < 0) {
        *refs = {0, 0, 0, refs->units};
        return fail;
    }
    const double start = list[static_cast<size_t>(first)].position;
    const double end = list[static_cast<size_t>(first + 1)].position;
    const double width = end - start;
    const double centre = (start + end) / 2;
    double period = 0, duty = 0;
    if (!unbounded) {
        period = list[static_cast<size_t>(2 * number)].position - list[static_cast<size_t>(2 * number - 2)].position;
        duty = width / period;
    }
    *out = {period * dt, width * dt, duty, (centre - t0) * dt + t0};
    return s;
}

namespace {

struct Transition {
    double start, end;
    int32_t startIndex, endIndex;  // samples behind the two crossings
    int32_t direction;
};

// Transitions between the low and high references, in order, at most `capacity`. A transition
// runs from the last crossing of the reference it leaves to the first crossing of the other.
int32_t FindTransitions(const double* x, int32_t n, double lo, double hi, Transition* list, int32_t capacity) {
    int32_t count = 0, state = 0, lastLow = -1, lastHigh = -1;
    for (int32_t i = 0; i < n && count < capacity; ++i) {
        const double v = x[i];
        if (v >= hi) {
            if (state == 1) list[count++] = {Between(x, lastLow, lo), Between(x, i - 1, hi), lastLow + 1, i, 1};
            state = 2;
            lastHigh = i;
        } else if (v <= lo) {
            if (state == 2) list[count++] = {Between(x, lastHigh, hi), Between(x, i - 1, lo), lastHigh + 1, i, 0};
            state = 1;
            lastLow = i;
        }
    }
    return count;
}

struct Extreme {
    double min, max;
    int32_t minAt, maxAt;
};

Extreme Extremes(const double* x, int32_t from, int32_t to) {
    Extreme e{INFINITY, -INFINITY, -1, -1};
    for (int32_t i = from; i <= to; ++i) {
        if (x[i] < e.min) e.min = x[(e.minAt = i)];
        if (x[i] > e.max) e.max = x[(e.maxAt = i)];
    }
    return e;
}

}  // namespace

Status TransitionCore(const double* x, int32_t n, double t0, double dt, int32_t polarity, int32_t number,
                      References* refs, const LevelSettings& ls, TransitionResult* out) {
    *out = {};
    StateInfo st{};
    double h = 0;
    Status s = ResolveLevels(x, n, t0, dt, number, refs, ls, true, &st, &h);
    if (s >= 0 && (refs->low > refs->mid || refs->mid > refs->high)) s = ReferenceOrderErr;
    if (s >= 0 && st.methodUsed == 1 && !(st.amplitude > 0)) s = LevelOrderErr;
    // Peak levels are replaced by the histogram's: the top and the base of the pulse.
    if (s >= 0 && st.methodUsed != 0) {
        Histogram hist{};
        const Status hs = HistogramLevels(x, n, ls.bins, ls.counters, &hist);
        if (hs < 0) {
            s = hs;
        } else {
            st.low = hist.low;
            st.high = hist.high;
            const double t = 0.05 * n;
            if (hist.lowCount < t || hist.highCount < t) s = Worse(s, StateLevelWeakWarn);
        }
    }
    Scratch<Transition> list;
    int32_t found = 0, k = -1;
    if (s >= 0) {
        const int32_t capacity = static_cast<int32_t>(std::min<int64_t>(2 * int64_t{number} + 1, n));
        if (list.Allocate(static_cast<size_t>(capacity)) != 0) {
            s = MeasureNoMemoryErr;
        } else {
            found = FindTransitions(x, n, refs->low, refs->high, list.get(), capacity);
            for (int32_t i = 0, seen = 0; i < found; ++i)
                if ((polarity == -1 || list[static_cast<size_t>(i)].direction == polarity) && ++seen == number) {
                    k = i;
                    break;
                }
            if (k < 0) s = TransitionNotFoundErr;
        }
    }
    if (s >= 0 && !(list[static_cast<size_t>(k)].end - list[static_cast<size_t>(k)].start > 0))
        s = ReferenceUnitErr;
    if (s < 0) {
        *refs = {0, 0, 0, refs->units};
        return s;
    }
    const Transition& tr = list[static_cast<size_t>(k)];
    const bool rising = tr.direction == 1;
    const double amplitude = st.high - st.low;
    const double b = st.fullRange / ls.bins / 2;
    const double slew = std::max(tr.end - tr.start, 1.0);
    double before = k > 0 ? (list[static_cast<size_t>(k - 1)].start + list[static_cast<size_t>(k - 1)].end) / 2 : 0;
    double after = k + 1 < found ? (list[static_cast<size_t>(k + 1)].start + list[static_cast<size_t>(k + 1)].end) / 2
                                 : n - 1;
    before = std::max(before, tr.start - 3 * slew);
    after = std::min(after, tr.end + 3 * slew);

    // The region before, without the foot of the edge itself.
    const auto from = static_cast<int32_t>(std::max(0.0, std::ceil(before)));
    int32_t to = tr.startIndex - 1;
    while (to >= from && (rising ? x[to] > st.low + b : x[to] < st.high - b)) --to;
    const Extreme pre = Extremes(x, from, to);
    // The region after, without the shoulder.
    int32_t lo = tr.endIndex;
    const auto last = static_cast<int32_t>(std::min(static_cast<double>(n - 1), std::floor(after)));
    while (lo <= last && (rising ? x[lo] < st.high - b : x[lo] > st.low + b)) ++lo;
    const Extreme post = Extremes(x, lo, last);

    double preValue = 0, postValue = 0;
    int32_t preAt = -1, postAt = -1;
    if (rising) {
        if (pre.minAt >= 0 && pre.min < st.low - b) preValue = (pre.min - st.low) * 100 / amplitude, preAt = pre.minAt;
        if (post.maxAt >= 0 && post.max > st.high + b)
            postValue = (post.max - st.high) * 100 / amplitude, postAt = post.maxAt;
    } else {
        if (pre.maxAt >= 0 && pre.max > st.high + b)
            preValue = (pre.max - st.high) * 100 / amplitude, preAt = pre.maxAt;
        if (post.minAt >= 0 && post.min < st.low - b)
            postValue = (post.min - st.low) * 100 / amplitude, postAt = post.minAt;
    }
    const double duration = tr.end - tr.start;
    out->slewRate = (refs->high - refs->low) / duration / dt;
    out->duration = duration * dt;
    out->start = t0 + tr.start * dt;
    out->end = t0 + tr.end * dt;
    out->preshoot = preValue;
    out->preshootTime = preValue != 0 ? t0 + preAt * dt : 0;
    out->overshoot = postValue;
    out->overshootTime = postValue != 0 ? t0 + postAt * dt : 0;
    return s;
}

Status CycleCore(const double* x, int32_t n, double t0, double dt, int32_t number, References* refs,
                 const LevelSettings& ls, CycleResult* out) {
    *out = {};
    PulseResult p{};
    Status s = PulseCore(x, n, t0, dt, -1, false, number, refs, ls, &p);
    if (s < 0) return s;
    const double start = p.centre - p.width / 2;
    const double first = std::trunc((start - t0) / dt);
    const double span = std::trunc(p.period / dt);
    if (!(first > 0)) {
        // A start before the first sample (or not a number) cannot begin a whole cycle either.
        *refs = {0, 0, 0, refs->units};
        return HistogramEmptyErr;
    }
    const auto i0 = static_cast<int64_t>(std::min(first, static_cast<double>(n)));
    const auto i1 = static_cast<int64_t>(std::min(first + std::max(span, 0.0), static_cast<double>(n)));
    double sum = 0, squares = 0;
    for (int64_t i = i0; i < i1; ++i) {
        sum += x[i];
        squares += x[i] * x[i];
    }
    const auto count = static_cast<double>(i1 - i0);
    if (count > 0) *out = {std::sqrt(squares / count), sum / count};
    return s;
}

}  // namespace tw
