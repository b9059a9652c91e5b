#include <algorithm>
#include <cstring>
#include <initializer_list>

#include "frame/frame.hpp"
#include "frame/host_link.hpp"
#include "measure/handles.hpp"
#include "measure/multitone.hpp"
#include "measure/peaks.hpp"
#include "measure/pulse.hpp"
#include "measure/state_levels.hpp"
#include "twanlys/link.h"
#include "twanlys/measure.h"

using namespace tw;

namespace {

void Zero(std::initializer_list<double*> results) {
    for (double* p : results)
        if (p != nullptr) *p = 0;
}

// A failed host resize is a measurement's allocation failure.
template <class T>
Status Grow(Frame& f, Handle& h, int32_t n, T** data) {
    return f.Resize(h, n, data) != 0 ? OutOfMemoryErr : 0;
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

namespace {

static_assert(sizeof(PeakDetectSettings) == 56 && sizeof(PeakDetectState) == 64);

// The detector's work buffer: projection (3 width), window copy, tail, last coefficients (3).
struct WorkParts {
    double *projection, *window, *tail, *last;
};
WorkParts Parts(double* base, int32_t width) {
    const auto w = static_cast<size_t>(width);
    return {base, base + 3 * w, base + 4 * w, base + 5 * w};
}

void EmptyF64(Handle& h) {
    if (h == nullptr) return;
    HostResize(TypeF64, 1, &h, 0);
    if (*h != nullptr) std::memset(*h, 0, 4);
}

Status StreamPeaks(Handle raw, PeakDetectSettings* settingsRecord, PeakDetectState* stateRecord, Handle& work,
                   int32_t mode) {
    // Without its records a stream has nowhere to report; refused like the other measurements,
    // and a failure still empties the outputs and the work buffer that are there.
    if (settingsRecord == nullptr || stateRecord == nullptr) {
        if (settingsRecord != nullptr) {
            Handle outs[3];
            std::memcpy(outs, &settingsRecord->locations, sizeof outs);
            for (Handle& h : outs) EmptyF64(h);
            std::memcpy(&settingsRecord->locations, outs, sizeof outs);
            const int32_t none = 0;
            std::memcpy(&settingsRecord->count, &none, sizeof none);
        }
        EmptyF64(work);
        return MeasureNullRecordErr;
    }
    PeakDetectSettings set;
    PeakDetectState st;
    std::memcpy(&set, settingsRecord, sizeof set);
    std::memcpy(&st, stateRecord, sizeof st);
    const bool first = (set.flags & 1u) != 0, final = (set.flags & 4u) != 0;
    Handle data = mode == 2 ? raw : set.data;
    const int32_t width = set.width, n = Count(data);

    Frame f;
    f.Output<double>(set.locations);
    f.Output<double>(set.amplitudes);
    f.Output<double>(set.secondDerivatives);
    Status s = width < 3 || width > 1073741824 ? InvalidSelectorErr : n < width ? WidthRangeErr : 0;
    double* wk = nullptr;
    const double* xs = nullptr;
    if (s == 0 && first && work == nullptr) s = NoPeakFoundErr;
    if (s == 0 && !first && (st.tailCount != width || Count(work) != 5 * width + 3)) s = StateSizeErr;
    if (s == 0) s = first ? Grow(f, work, 5 * width + 3, &wk) : f.InPlace(work, &wk);
    if (s == 0) s = f.In(data, &xs);
    const WorkParts w = s == 0 ? Parts(wk, width) : WorkParts{};
    if (s == 0 && first) {
        s = PeakProjection(width, w.projection);
        std::copy(xs, xs + width, w.tail);
        st.windowsDone = 0;
        st.lastSign = 0;
        w.last[0] = w.last[1] = w.last[2] = 0;
    }
    // The stream seen by this block: the carried tail, then the block's samples not yet carried.
    const int32_t skip = first ? width : 0;
    const int32_t rest = n - skip;
    Scratch<double> joined;
    Peak* peaks = nullptr;
    int32_t count = 0, capacity = 0;
    if (s == 0) s = joined.Allocate(static_cast<size_t>(width) + static_cast<size_t>(rest));
    if (s == 0) {
        double* j = joined.get();
        std::copy(w.tail, w.tail + width, j);
        std::copy(xs + skip, xs + n, j + width);
        std::copy(j + rest, j + rest + width, w.tail);
        double offset = 0;
        bool flat = false;
        if (mode != 0) {
            double lo = j[0], hi = j[0], sum = 0;
            for (int32_t i = 0; i < width + rest; ++i) {
                lo = std::min(lo, j[i]);
                hi = std::max(hi, j[i]);
                sum += j[i];
            }
            if (hi - lo < 1e-8) {
                flat = true;
                offset = sum / (width + rest);
                for (int32_t i = 0; i < width + rest; ++i) j[i] -= offset;
            }
        }
        PeakScanState ps{st.windowsDone, st.lastSign, w.last};
        s = PeakScan(w.projection, width, set.polarity, set.threshold, j, rest + (final ? 1 : 0), flat, offset,
                     w.window, &ps, &peaks, &count, &capacity);
        st.windowsDone = ps.windowsDone;
        st.lastSign = ps.lastSign;
    }
    double *loc = nullptr, *amp = nullptr, *d2 = nullptr;
    if (s == 0) s = Grow(f, set.locations, count, &loc);
    if (s == 0) s = Grow(f, set.amplitudes, count, &amp);
    if (s == 0) s = Grow(f, set.secondDerivatives, count, &d2);
    if (s == 0)
        for (int32_t i = 0; i < count; ++i) loc[i] = peaks[i].location, amp[i] = peaks[i].amplitude,
                                            d2[i] = peaks[i].secondDerivative;
    ScratchFree(peaks);
    s = f.Finish(s);
    if (s < 0 || final) {
        EmptyF64(work);
        st = {};
    } else {
        // The record points into the host's block, wherever the host placed it.
        auto* base = reinterpret_cast<double*>(static_cast<unsigned char*>(*work) + 4);
        const auto wz = static_cast<size_t>(width);
        st.width = width;
        st.tailCount = st.carried = width;
        st.polarity = set.polarity;
        st.projection = base;
        st.window = base + 3 * wz;
        st.tail = base + 4 * wz;
        st.lastCoefficients = base + 5 * wz;
        st.data = reinterpret_cast<const double*>(static_cast<unsigned char*>(*data) + 4) + skip;
    }
    set.count = s < 0 ? 0 : count;
    std::memcpy(stateRecord, &st, sizeof st);
    std::memcpy(&settingsRecord->locations, &set.locations, 3 * sizeof(Handle));
    std::memcpy(&settingsRecord->count, &set.count, sizeof set.count);
    return s;
}

}  // namespace

TW_API int32_t PeakDetector(Array1DHandle x, double* threshold, int32_t* width, Array1DHandle locations,
                            int32_t* count, int32_t* status) {
    Frame f;
    f.Output<int32_t>(locations);
    const int32_t n = Count(x);
    Status s = n < 1 ? EmptyArrayErr : (*width < 1 || *width >= n) ? WidthRangeErr : 0;
    const double* xs = nullptr;
    int32_t* loc = nullptr;
    int32_t found = 0;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = Grow(f, locations, n / *width + 1, &loc);
    if (s == 0) {
        found = ThresholdRuns(xs, n, *threshold, *width, loc);
        s = Grow(f, locations, found, &loc);
    }
    s = f.Finish(s);
    *count = s < 0 ? 0 : found;
    *status = s;
    return s;
}

TW_API int32_t PeakD2014(Array1DHandle raw, PeakDetectSettings* settings, PeakDetectState* state,
                         Array1DHandle work, int32_t* status, int32_t mode) {
    const Status s = StreamPeaks(raw, settings, state, work, mode);
    if (status != nullptr) *status = s;
    return s;
}

TW_API int32_t PeakD2010(PeakDetectSettings* settings, PeakDetectState* state, Array1DHandle work,
                         int32_t* status, int32_t mode) {
    return PeakD2014(nullptr, settings, state, work, status, mode);
}

TW_API int32_t PeakD(PeakDetectSettings* settings, PeakDetectState* state, Array1DHandle work, int32_t* status) {
    return PeakD2010(settings, state, work, status, 0);
}

namespace {

int32_t Nothing() { return 0; }

}  // namespace

// The measurements hold no state: the companions of the fetch entry have nothing to do.
TW_API int32_t measurements_create(void) { return Nothing(); }
TW_API int32_t measurements_clear(void) { return Nothing(); }
TW_API int32_t measurements_destroy(void) { return Nothing(); }

TW_API int32_t measurements_fetch(void*, int32_t selector, const MeasureReferences* references,
                                  const HistogramSettings* histogram, int32_t polarity, double t0, double dt,
                                  const double* samples, int32_t n, int32_t strict, double* result) {
    Status s = 0;
    if (n < 1 || samples == nullptr) s = MeasureEmptyWaveformErr;
    else if (!(dt > 0)) s = MeasureDtErr;
    double values[8] = {};
    int32_t written = 0;
    Scratch<double> copy;
    if (s == 0) {
        const double* xs = samples;
        // The host's samples may be only 4-byte aligned.
        if (reinterpret_cast<uintptr_t>(samples) % alignof(double) != 0) {
            s = copy.Allocate(static_cast<size_t>(n));
            if (s == 0) std::memcpy(copy.get(), samples, static_cast<size_t>(n) * sizeof(double));
            xs = copy.get();
        }
        void* none = nullptr;
        if (s == 0)
            s = MeasureFrame(nullptr, references, histogram, &none, true, strict,
                             [&](const double*, int32_t, References* r, const LevelSettings& ls) {
                return FetchMeasurement(selector, *r, ls, polarity == 0xFFFF ? -1 : polarity, t0, dt, xs, n,
                                        values, &written);
            });
        if (none != nullptr) MeasurementUnreserveProc(&none);
    }
    if (s < 0) written = FetchSlots(selector);
    if (result != nullptr) {
        if (written >= 1) std::memcpy(result, &values[0], sizeof(double));
        if (written == 2) std::memcpy(result + 2, &values[2], sizeof(double));
        if (written == 8) std::memcpy(result, values, sizeof values);
    }
    return s;
}

TW_API int32_t MultipleToneMeasurements(Array1DHandle x, int32_t n, double dt, int32_t sort, int32_t residualMode,
                                        double threshold, int32_t maxTones, int32_t* found, Array1DHandle frequencies,
                                        Array1DHandle amplitudes, Array1DHandle phases, Array1DHandle residual,
                                        double* dtOut, Array1DHandle spectrum, double* f0, double* df) {
    Status s = n < 1 ? EmptyArrayErr : maxTones < 0 ? NegativeArgumentErr : 0;
    if (s == 0 && maxTones == 0) return 0;
    if (s == 0 && n > Count(x)) s = SizeMismatchErr;
    Frame f;
    for (Handle* h : {&frequencies, &amplitudes, &phases, &residual, &spectrum}) f.Output<double>(*h);
    MultitoneOutputs o{};
    const double* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = Grow(f, residual, n, &o.residual);
    if (s == 0) s = Grow(f, spectrum, (n + 1) / 2, &o.spectrum);
    if (s == 0) s = Grow(f, frequencies, maxTones, &o.frequencies);
    if (s == 0) s = Grow(f, amplitudes, maxTones, &o.amplitudes);
    if (s == 0) s = Grow(f, phases, maxTones, &o.phases);
    if (s == 0) s = MultitoneCore(xs, n, dt, sort, residualMode, threshold, maxTones, &o);
    // The tone arrays shrink to the tones found; staged views are written back first.
    if (s >= 0) s = f.Finish(s);
    if (s >= 0) {
        double* unused = nullptr;
        Frame g;
        for (Handle* h : {&frequencies, &amplitudes, &phases}) {
            if (s == 0) s = Grow(g, *h, o.found, &unused);
        }
        s = g.Finish(s);
    } else {
        s = f.Finish(s);
    }
    if (s < 0) {
        // Five arrays emptied; residual and spectrum are shrunk with the rest.
        o = {};
        for (Handle* h : {&frequencies, &amplitudes, &phases, &residual, &spectrum})
            if (*h != nullptr) {
                HostResize(TypeF64, 1, h, 0);
                if (**h != nullptr) std::memset(**h, 0, 4);
            }
    }
    if (found != nullptr) *found = o.found;
    if (dtOut != nullptr) *dtOut = o.dt;
    if (f0 != nullptr) *f0 = o.f0;
    if (df != nullptr) *df = o.df;
    return s;
}
