#include <initializer_list>

#include "frame/frame.hpp"
#include "signal/calculus.hpp"
#include "signal/modulators.hpp"
#include "signal/triggers.hpp"
#include "twanlys/signal.h"

using namespace tw;

namespace {

// Boundary samples a method reads on each side of the block.
struct Reach {
    int32_t init;
    int32_t fin;
};
constexpr Reach kDerivativeReach[] = {{1, 1}, {2, 2}, {0, 1}, {1, 0}};
constexpr Reach kIntegralReach[] = {{1, 0}, {1, 1}, {2, 1}, {2, 2}, {0, 0}, {0, 0}};

// A boundary that must hold one sample is refused as empty; one that must hold two as too short.
Status Lacking(int32_t need, int32_t have) {
    if (need == 1 && have < 1) return EmptyArrayErr;
    if (need == 2 && have < 2) return TooFewSamples2Err;
    return 0;
}

Status BoundaryStatus(Reach r, Handle init, Handle fin) {
    if (const Status s = Lacking(r.init, Count(init))) return s;
    return Lacking(r.fin, Count(fin));
}

// The frame of the in-place operations with boundary arrays: x is worked on in place (and
// emptied on failure); `checked` is the outcome of the export's own tests.
template <class Core>
Status WithBoundaries(Handle& x, Handle init, Handle fin, Reach r, Status checked, Core core) {
    Frame f;
    f.Output<double>(x);
    double* xs = nullptr;
    const double *is = nullptr, *fs = nullptr;
    Status s = checked;
    if (s == 0) s = f.InPlace(x, &xs);
    if (s == 0) s = f.In(init, &is);
    if (s == 0) s = f.In(fin, &fs);
    if (s == 0) core(xs, Count(x), MakeEdges(is, Count(init), r.init, fs, Count(fin)));
    return f.Finish(s);
}

Status Differentiate(Handle& x, Handle init, Handle fin, double dt, int32_t method, Status checked) {
    const Reach r = checked == 0 ? kDerivativeReach[method] : Reach{0, 0};
    return WithBoundaries(x, init, fin, r, checked, [&](double* xs, int32_t n, const Edges& e) {
        DifferentiateInPlace(xs, n, e, dt, method);
    });
}

Status Integrate(Handle& x, Handle init, Handle fin, double dt, int32_t method, Status checked) {
    const Reach r = checked == 0 ? kIntegralReach[method] : Reach{0, 0};
    return WithBoundaries(x, init, fin, r, checked, [&](double* xs, int32_t n, const Edges& e) {
        IntegrateInPlace(xs, n, e, dt, method);
    });
}

// The frame of the in-place operations on x alone.
template <class Core>
Status InPlaceOnly(Handle& x, Status checked, Core core) {
    Frame f;
    f.Output<double>(x);
    double* xs = nullptr;
    Status s = checked;
    if (s == 0) s = f.InPlace(x, &xs);
    if (s == 0) core(xs, Count(x));
    return f.Finish(s);
}

Status Unwrap(Handle& phase, int32_t units) {
    const Status checked = Count(phase) < 1 ? SizeMismatchErr : 0;
    return InPlaceOnly(phase, checked, [units](double* xs, int32_t n) { UnwrapInPlace(xs, n, units); });
}

bool Positive(double dt) { return dt > 0; }  // NaN is not

bool AnyNegative(std::initializer_list<int32_t> counts) {
    for (const int32_t c : counts)
        if (c < 0) return true;
    return false;
}

// The per-channel settings, each an aligned view with its count.
Status ReadSettings(Frame& f, Handle level, Handle hysteresis, Handle slope, TriggerSettings* t) {
    *t = {nullptr, Count(level), nullptr, Count(hysteresis), nullptr, Count(slope)};
    Status s = f.In(level, &t->level);
    if (s == 0) s = f.In(hysteresis, &t->hysteresis);
    if (s == 0) s = f.In(slope, &t->slope);
    return s;
}

// A failed resize (the host's own code, or a failed aligned copy) is out of memory.
template <class T>
Status ResizeOut(Frame& f, Handle& h, int32_t n, T** data) {
    return f.Resize(h, n, data) == 0 ? 0 : OutOfMemoryErr;
}

// The per-channel outputs of both triggers, zero-filled.
Status ResizeCounts(Frame& f, Handle& counts, Handle& found, int32_t rows, int32_t** c, int32_t** fd) {
    Status s = ResizeOut(f, counts, rows, c);
    if (s == 0) s = ResizeOut(f, found, rows, fd);
    if (s == 0)
        for (int32_t i = 0; i < rows; ++i) (*c)[i] = (*fd)[i] = 0;
    return s;
}

}  // namespace

TW_API int32_t Derivative(Array1DHandle x, Array1DHandle init, Array1DHandle final_, double* dt,
                          int32_t* status) {
    Status checked = !Positive(*dt) ? SampleIntervalErr : Count(x) < 1 ? EmptyArrayErr : 0;
    return ToPointer(status, Differentiate(x, init, final_, *dt, 0, checked));
}

TW_API int32_t Derivative85(Array1DHandle x, Array1DHandle init, Array1DHandle final_, double* dt,
                            int32_t method) {
    Status checked = Count(x) < 1 ? EmptyArrayErr : !Positive(*dt) ? SampleIntervalErr : 0;
    if (checked == 0 && (method < 0 || method > 3)) checked = InvalidSelectorErr;
    if (checked == 0) checked = BoundaryStatus(kDerivativeReach[method], init, final_);
    return Differentiate(x, init, final_, *dt, method, checked);
}

TW_API int32_t Integral(Array1DHandle x, Array1DHandle init, Array1DHandle final_, double* dt,
                        int32_t* status) {
    Status checked = Count(x) < 1 ? EmptyArrayErr : !Positive(*dt) ? SampleIntervalErr : 0;
    if (checked == 0) checked = BoundaryStatus(kIntegralReach[1], init, final_);
    return ToPointer(status, Integrate(x, init, final_, *dt, 1, checked));
}

TW_API int32_t Integral90(Array1DHandle x, Array1DHandle init, Array1DHandle final_, double dt,
                          int32_t method) {
    Status checked = !Positive(dt) ? SampleIntervalErr : Count(x) < 1 ? EmptyArrayErr : 0;
    if (checked == 0 && (method < 0 || method > 5)) checked = InvalidSelectorErr;
    if (checked == 0) checked = BoundaryStatus(kIntegralReach[method], init, final_);
    return Integrate(x, init, final_, dt, method, checked);
}

TW_API int32_t Integral_2017(Array1DHandle x, double dt, int32_t method) {
    const int32_t n = Count(x);
    Status checked = !Positive(dt) ? SampleIntervalErr : n < 1 ? EmptyArrayErr : 0;
    if (checked == 0 && (method < 0 || method > 5)) checked = InvalidSelectorErr;
    if (checked == 0 && n < (method <= 3 ? method + 2 : 2)) checked = SizeMismatchErr;
    return InPlaceOnly(x, checked, [&](double* xs, int32_t m) { IntegrateFromStart(xs, m, dt, method); });
}

TW_API int32_t unWrap(Array1DHandle phase, int32_t* status) { return ToPointer(status, Unwrap(phase, 0)); }

TW_API int32_t unWrap85(Array1DHandle phase, int32_t units) { return Unwrap(phase, units); }

TW_API int32_t Triggerh(Array2DHandle x, Array1DHandle level, Array1DHandle previous,
                        Array1DHandle hysteresis, Array1DHandle slope, int32_t maximum, Array1DHandle indices,
                        Array1DHandle counts, Array1DHandle found, Array1DHandle last, int32_t* status) {
    Frame f;
    f.Output<int32_t>(indices);
    f.Output<int32_t>(counts);
    f.Output<int32_t>(found);
    f.Output<double>(last);
    const Shape d = Dims(x);
    const int32_t width = maximum > 0 ? maximum : 0;
    Status s = AnyNegative({d.rows, d.cols, Count(level), Count(previous), Count(hysteresis), Count(slope)})
                   ? NegativeSizeErr
                   : 0;
    const int64_t cells = int64_t{d.rows} * width;
    if (s == 0 && cells > INT32_MAX) s = OutOfMemoryErr;
    const double *xs = nullptr, *prev = nullptr;
    TriggerSettings t{};
    if (s == 0) s = f.In2D(x, &xs);
    if (s == 0) s = f.In(previous, &prev);
    if (s == 0) s = ReadSettings(f, level, hysteresis, slope, &t);
    int32_t *idx = nullptr, *cnt = nullptr, *fnd = nullptr;
    double* lst = nullptr;
    if (s == 0) s = ResizeOut(f, indices, static_cast<int32_t>(cells), &idx);
    if (s == 0) s = ResizeCounts(f, counts, found, d.rows, &cnt, &fnd);
    if (s == 0) s = ResizeOut(f, last, d.rows, &lst);
    if (s == 0) {
        for (int64_t i = 0; i < cells; ++i) idx[i] = 0;
        for (int32_t i = 0; i < d.rows; ++i) lst[i] = 0;
        TriggerChannelsPacked(xs, d.rows, d.cols, t, prev, Count(previous), maximum, idx,
                              static_cast<int32_t>(cells), cnt, fnd, lst);
    }
    return ToPointer(status, f.Finish(s));
}

TW_API int32_t Triggerh_86(Array2DHandle x, Array1DHandle level, Array1DHandle armed,
                           Array1DHandle hysteresis, Array1DHandle slope, int32_t maximum,
                           Array2DHandle indices, Array1DHandle counts, Array1DHandle found) {
    Frame f;
    f.Output<int32_t>(armed);
    f.Output2D<int32_t>(indices);
    f.Output<int32_t>(counts);
    f.Output<int32_t>(found);
    const Shape d = Dims(x);
    const int32_t width = maximum > 0 ? maximum : 0;
    Status s = AnyNegative({d.rows, d.cols, Count(level), Count(armed), Count(hysteresis), Count(slope)})
                   ? NegativeSizeErr
                   : 0;
    const double* xs = nullptr;
    TriggerSettings t{};
    if (s == 0) s = f.In2D(x, &xs);
    if (s == 0) s = ReadSettings(f, level, hysteresis, slope, &t);
    // The incoming flags are read before the armed array is resized to one per channel.
    Scratch<int32_t> flags;
    if (s == 0) s = flags.Allocate(static_cast<size_t>(d.rows) + 1);
    if (s == 0) {
        const int32_t* in = nullptr;
        s = f.In(armed, &in);
        for (int32_t c = 0; s == 0 && c < d.rows; ++c) flags[c] = c < Count(armed) ? in[c] : 0;
    }
    int32_t *arm = nullptr, *idx = nullptr, *cnt = nullptr, *fnd = nullptr;
    if (s == 0) s = ResizeOut(f, armed, d.rows, &arm);
    if (s == 0 && f.Resize2D(indices, d.rows, width, &idx) != 0) s = OutOfMemoryErr;
    if (s == 0) s = ResizeCounts(f, counts, found, d.rows, &cnt, &fnd);
    if (s == 0) {
        for (int32_t c = 0; c < d.rows; ++c) arm[c] = flags[c];
        TriggerChannels(xs, d.rows, d.cols, t, arm, maximum, idx, cnt, fnd);
    }
    return f.Finish(MergeRelease(s, flags.Release()));
}

TW_API int32_t PulseParameters(Array1DHandle x, double* top, double* base, double* amplitude, double* delay,
                               double* width, double* slew, double* fall, double* rise, double* overshoot,
                               double* undershoot, int32_t* status) {
    // Failure zeroes the results rather than NaN-ing them, so they are not registered.
    Frame f;
    const int32_t n = Count(x);
    const double* xs = nullptr;
    Status s = n < 1 ? EmptyArrayErr : f.In(x, &xs);
    PulseResults r{};
    if (s == 0) r = MeasurePulse(xs, n);
    s = f.Finish(s);
    if (s < 0) r = PulseResults{};
    *top = r.top;
    *base = r.base;
    *amplitude = r.amplitude;
    *delay = r.delay;
    *width = r.width;
    *slew = r.slew;
    *fall = r.fall;
    *rise = r.rise;
    *overshoot = r.overshoot;
    *undershoot = r.undershoot;
    return ToPointer(status, s);
}

TW_API void CxComplexModulatorH(Array1DHandle x, double frequency, double fs, double* phase) {
    const int32_t n = Count(x);
    if (n < 1 || frequency == 0) return;
    Frame f;
    cdouble* xs = nullptr;
    double p = *phase;
    Status s = f.InPlace(x, &xs);
    if (s == 0) ModulateComplex(xs, n, kTwoPi * (frequency / fs), &p);
    if (f.Finish(s) == 0) *phase = p;
}

TW_API void ReComplexModulatorH(Array1DHandle x, double frequency, double fs, double* phase,
                                Array1DHandle y) {
    const int32_t n = Count(x);
    if (n < 1) return;
    Frame f;
    f.Output<cdouble>(y);
    const double* xs = nullptr;
    cdouble* ys = nullptr;
    Status s = f.In(x, &xs);
    if (s == 0) s = f.Resize(y, n, &ys);
    if (frequency == 0) {
        // The phase is neither read nor written.
        for (int32_t k = 0; s == 0 && k < n; ++k) ys[k] = {xs[k], 0.0};
        f.Finish(s);
        return;
    }
    double p = 0;
    if (s == 0) {
        p = *phase;
        ModulateReal(xs, n, kTwoPi * (frequency / fs), &p, ys);
    }
    if (f.Finish(s) == 0) *phase = p;
}

TW_API void PhasMod(int32_t n, double k, double* phase, double carrier, double* x, double* peak,
                    double* accumulator) {
    if (n <= 0) return;
    PhaseModulate(n, k, phase, carrier, x, peak, accumulator);
}

TW_API void FreqMod(int32_t n, double k, double* phase, double carrier, double* x, double* peak,
                    double* accumulator) {
    if (n <= 0) return;
    FrequencyModulate(n, k, phase, carrier, x, peak, accumulator);
}
