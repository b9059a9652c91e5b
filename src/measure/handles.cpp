#include "measure/handles.hpp"

#include <cmath>

#include "measure/state_levels.hpp"

namespace tw {
int32_t FetchSlots(int32_t selector) {
    if (selector < 0 || selector > 33) return 0;
    if (selector == 28 || selector == 29) return 2;
    return selector >= 32 ? 8 : 1;
}

Status FetchMeasurement(int32_t selector, References refs, const LevelSettings& ls, int32_t polarity, double t0,
                        double dt, const double* x, int32_t n, double* values, int32_t* written) {
    *written = FetchSlots(selector);
    Status s = 0;
    double& v = values[0];
    if (selector >= 0 && selector <= 8) {
        static constexpr int32_t kMethod[3] = {1, 0, 2};
        int32_t used = 0;
        double high = 0, low = 0, amplitude = 0;
        s = StateLevelsCore(x, t0, dt, n, kMethod[selector / 3], ls.bins, ls.counters, &used, &high, &low, &amplitude,
                            ls.strict, nullptr);
        // Peak and histogram selectors run low, high, amplitude; the automatic ones high, low, amplitude.
        const double peak[3] = {low, high, amplitude}, automatic[3] = {high, low, amplitude};
        const double* row = selector >= 6 ? automatic : peak;
        v = row[selector % 3];
    } else if (selector >= 9 && selector <= 12) {
        double h = 0;
        s = ReferenceLevels(x, n, t0, dt, &refs, ls, &h);
        const double r[4] = {refs.low, refs.mid, refs.high, h};
        v = r[selector - 9];
    } else if (selector == 13 || selector == 14 || selector == 21) {
        double sum = 0, squares = 0;
        for (int32_t i = 0; i < n; ++i) {
            sum += x[i];
            squares += x[i] * x[i];
        }
        v = selector == 13 ? std::sqrt(squares / n) : selector == 14 ? sum / n : std::sqrt(squares);
    } else if (selector == 15 || selector == 16 || (selector >= 22 && selector <= 25) || selector == 30 ||
               selector == 31) {
        // Pairs 22/23, 24/25, 30/31: the even selector is the positive pulse.
        const int32_t pol = selector <= 16 ? -1 : selector % 2 == 0 ? 1 : 0;
        PulseResult p{};
        s = PulseCore(x, n, t0, dt, pol, false, 1, &refs, ls, &p);
        v = selector == 15 ? p.period : selector == 16 ? 1 / p.period : selector <= 23 ? p.width
            : selector <= 25 ? p.duty : p.centre;
    } else if (selector == 17 || selector == 18) {
        CycleResult c{};
        s = CycleCore(x, n, t0, dt, 1, &refs, ls, &c);
        v = selector == 17 ? c.rms : c.mean;
    } else if ((selector >= 19 && selector <= 20) || (selector >= 26 && selector <= 29) || selector == 32 ||
               selector == 33) {
        const bool picked = selector == 28 || selector == 29;
        const int32_t pol = picked ? polarity : (selector == 20 || selector == 27 || selector == 33) ? 0 : 1;
        TransitionResult t{};
        s = TransitionCore(x, n, t0, dt, pol, 1, &refs, ls, &t);
        if (selector <= 20) {
            v = t.duration;
        } else if (selector <= 27) {
            v = t.slewRate;
        } else if (picked) {
            v = selector == 28 ? t.preshoot : t.overshoot;
            values[2] = selector == 28 ? t.preshootTime : t.overshootTime;
        } else {
            const double r[8] = {t.slewRate, t.duration, t.start, t.end, t.preshoot, t.preshootTime,
                                 t.overshoot, t.overshootTime};
            for (int i = 0; i < 8; ++i) values[i] = r[i];
        }
    }
    if (s < 0)
        for (int i = 0; i < 8; ++i) values[i] = 0;
    return s;
}

}  // namespace tw
