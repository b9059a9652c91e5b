#include <cstring>
#include <initializer_list>

#include "frame/frame.hpp"
#include "measure/pulse.hpp"
#include "measure/state_levels.hpp"
#include "twanlys/measure.h"

using namespace tw;

namespace {

void Zero(std::initializer_list<double*> results) {
    for (double* p : results)
        if (p != nullptr) *p = 0;
}

int32_t Polarity(uint16_t p) { return p == 0xFFFF ? -1 : p; }

// The shared frame: record and histogram checks, the bin buffer, an aligned view of x.
template <class Core>
Status MeasureFrame(Handle x, const MeasureReferences* references, const HistogramSettings* histogram,
                    void** cell, bool instanceData, int32_t strict, Core core) {
    if (references == nullptr || histogram == nullptr) return MeasureNullRecordErr;
    uint32_t method;
    int32_t bins;
    std::memcpy(&method, &histogram->method, sizeof method);
    std::memcpy(&bins, &histogram->bins, sizeof bins);
    if (bins < 1) return HistogramSizeErr;
    if (method > 2) return HistogramMethodErr;
    References r{};
    std::memcpy(&r.high, &references->high, sizeof r.high);
    std::memcpy(&r.mid, &references->mid, sizeof r.mid);
    std::memcpy(&r.low, &references->low, sizeof r.low);
    std::memcpy(&r.units, &references->units, sizeof r.units);
    void* local = nullptr;
    int32_t* counters = nullptr;
    Status s = AcquireBins(cell != nullptr ? cell : &local, bins, instanceData || cell == nullptr, &counters);
    if (s == 0) {
        Frame f;
        const double* xs = nullptr;
        s = f.In(x, &xs);
        if (s == 0) s = core(xs, Count(x), &r, LevelSettings{static_cast<int32_t>(method), bins, counters, strict});
        s = f.Finish(s);
    }
    if (local != nullptr) {
        PlainFree(static_cast<BinBuffer*>(local)->bins);
        PlainFree(local);
    }
    return s;
}

Status Levels(Handle x, double t0, double dt, int32_t method, int32_t bins, void** cell, bool instanceData,
              double* high, double* low, double* amplitude, int32_t strict) {
    Status s = bins < 1 ? HistogramSizeErr : 0;
    int32_t* counters = nullptr;
    void* local = nullptr;
    if (s == 0) s = AcquireBins(cell != nullptr ? cell : &local, bins, instanceData || cell == nullptr, &counters);
    if (s == 0) {
        Frame f;
        const double* xs = nullptr;
        s = f.In(x, &xs);
        int32_t used = -1;
        double h = 0, l = 0, a = 0;
        if (s == 0) s = StateLevelsCore(xs, t0, dt, Count(x), method, bins, counters, &used, &h, &l, &a, strict, nullptr);
        s = f.Finish(s);
        if (s >= 0) *high = h, *low = l, *amplitude = a;
    }
    if (local != nullptr) {
        PlainFree(static_cast<BinBuffer*>(local)->bins);
        PlainFree(local);
    }
    if (s < 0) Zero({high, low, amplitude});
    return s;
}

Status Pulse(Handle x, double t0, double dt, uint16_t polarity, uint16_t unbounded, int32_t number,
             const MeasureReferences* references, const HistogramSettings* histogram, void** cell,
             bool instanceData, double* period, double* width, double* duty, double* centre, double* low,
             double* mid, double* high, int32_t strict) {
    const Status s = MeasureFrame(x, references, histogram, cell, instanceData, strict,
                                  [&](const double* xs, int32_t n, References* r, const LevelSettings& ls) {
        PulseResult p{};
        const Status c = PulseCore(xs, n, t0, dt, Polarity(polarity), unbounded != 0, number, r, ls, &p);
        *period = p.period, *width = p.width, *duty = p.duty, *centre = p.centre;
        *low = r->low, *mid = r->mid, *high = r->high;
        return c;
    });
    if (s < 0) Zero({period, width, duty, centre, low, mid, high});
    return s;
}

Status Transition(Handle x, double t0, double dt, uint16_t polarity, int32_t number,
                  const MeasureReferences* references, const HistogramSettings* histogram, void** cell,
                  bool instanceData, double* const (&o)[11], int32_t strict) {
    const Status s = MeasureFrame(x, references, histogram, cell, instanceData, strict,
                                  [&](const double* xs, int32_t n, References* r, const LevelSettings& ls) {
        TransitionResult t{};
        const Status c = TransitionCore(xs, n, t0, dt, Polarity(polarity), number, r, ls, &t);
        const double v[11] = {t.slewRate, t.duration, t.start, t.end, t.preshoot, t.preshootTime,
                              t.overshoot, t.overshootTime, r->low, r->mid, r->high};
        for (int i = 0; i < 11; ++i) *o[i] = v[i];
        return c;
    });
    if (s < 0)
        for (double* p : o) Zero({p});
    return s;
}

Status Cycle(Handle x, double t0, double dt, int32_t number, const MeasureReferences* references,
             const HistogramSettings* histogram, void** cell, bool instanceData, double* rms, double* mean,
             double* low, double* mid, double* high, int32_t strict) {
    const Status s = MeasureFrame(x, references, histogram, cell, instanceData, strict,
                                  [&](const double* xs, int32_t n, References* r, const LevelSettings& ls) {
        CycleResult c{};
        const Status cs = CycleCore(xs, n, t0, dt, number, r, ls, &c);
        *rms = c.rms, *mean = c.mean;
        *low = r->low, *mid = r->mid, *high = r->high;
        return cs;
    });
    if (s < 0) Zero({rms, mean, low, mid, high});
    return s;
}

}  // namespace

TW_API int32_t StateLevels(Array1DHandle x, double t0, double dt, int32_t method, int32_t bins, void** cell,
                           double* high, double* low, double* amplitude, int32_t strict) {
    return Levels(x, t0, dt, method, bins, cell, false, high, low, amplitude, strict);
}

TW_API int32_t StateLevels_IDP(Array1DHandle x, double t0, double dt, int32_t method, int32_t bins,
                               void** cell, double* high, double* low, double* amplitude, int32_t strict) {
    return Levels(x, t0, dt, method, bins, cell, true, high, low, amplitude, strict);
}

TW_API int32_t PulseMeasEx(Array1DHandle x, double t0, double dt, uint16_t polarity, uint16_t unbounded,
                           int32_t number, const MeasureReferences* references,
                           const HistogramSettings* histogram, void** cell, double* period, double* width,
                           double* duty, double* centre, double* low, double* mid, double* high, int32_t strict) {
    return Pulse(x, t0, dt, polarity, unbounded, number, references, histogram, cell, false, period, width, duty,
                 centre, low, mid, high, strict);
}

TW_API int32_t PulseMeas(Array1DHandle x, double t0, double dt, uint16_t polarity, int32_t number,
                         const MeasureReferences* references, const HistogramSettings* histogram, void** cell,
                         double* period, double* width, double* duty, double* centre, double* low,
                         double* mid, double* high, int32_t strict) {
    return Pulse(x, t0, dt, polarity, 0, number, references, histogram, cell, false, period, width, duty, centre,
                 low, mid, high, strict);
}

TW_API int32_t PulseMeasEx_IDP(Array1DHandle x, double t0, double dt, uint16_t polarity, uint16_t unbounded,
                               int32_t number, const MeasureReferences* references,
                               const HistogramSettings* histogram, void** cell, double* period, double* width,
                               double* duty, double* centre, double* low, double* mid, double* high,
                               int32_t strict) {
    return Pulse(x, t0, dt, polarity, unbounded, number, references, histogram, cell, true, period, width, duty,
                 centre, low, mid, high, strict);
}

TW_API int32_t TransMeas(Array1DHandle x, double t0, double dt, uint16_t polarity, int32_t number,
                         const MeasureReferences* references, const HistogramSettings* histogram, void** cell,
                         double* slewRate, double* duration, double* startTime, double* endTime,
                         double* preshoot, double* preshootTime, double* overshoot, double* overshootTime,
                         double* low, double* mid, double* high, int32_t strict) {
    double* const o[11] = {slewRate, duration, startTime, endTime, preshoot, preshootTime,
                           overshoot, overshootTime, low, mid, high};
    return Transition(x, t0, dt, polarity, number, references, histogram, cell, false, o, strict);
}

TW_API int32_t TransMeas_IDP(Array1DHandle x, double t0, double dt, uint16_t polarity, int32_t number,
                             const MeasureReferences* references, const HistogramSettings* histogram,
                             void** cell, double* slewRate, double* duration, double* startTime,
                             double* endTime, double* preshoot, double* preshootTime, double* overshoot,
                             double* overshootTime, double* low, double* mid, double* high, int32_t strict) {
    double* const o[11] = {slewRate, duration, startTime, endTime, preshoot, preshootTime,
                           overshoot, overshootTime, low, mid, high};
    return Transition(x, t0, dt, polarity, number, references, histogram, cell, true, o, strict);
}

TW_API int32_t CycleRMSAverage(Array1DHandle x, double t0, double dt, int32_t number,
                               const MeasureReferences* references, const HistogramSettings* histogram,
                               void** cell, double* rms, double* mean, double* low, double* mid, double* high,
                               int32_t strict) {
    return Cycle(x, t0, dt, number, references, histogram, cell, false, rms, mean, low, mid, high, strict);
}

TW_API int32_t CycleRMSAverage_IDP(Array1DHandle x, double t0, double dt, int32_t number,
                                   const MeasureReferences* references, const HistogramSettings* histogram,
                                   void** cell, double* rms, double* mean, double* low, double* mid,
                                   double* high, int32_t strict) {
    return Cycle(x, t0, dt, number, references, histogram, cell, true, rms, mean, low, mid, high, strict);
}
