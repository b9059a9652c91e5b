#include <cmath>

#include "frame/frame.hpp"
#include "generate/block_frame.hpp"
#include "generate/patterns.hpp"
#include "twanlys/generate.h"

using namespace tw;

namespace {

Status Length(int32_t n) { return n < 1 ? EmptyArrayErr : 0; }

// A pattern that cannot fail once its tests have passed.
template <class Fill>
int32_t Pattern(Handle out, int32_t n, Status checked, int32_t* status, Fill fill) {
    return FillByPointer<double>(out, n, checked, status, [&](Frame&, double* y, int32_t m) {
        fill(y, m);
        return Status{0};
    });
}

// The pulses: the shape's own tests, then the length and dt of the grid. A non-empty out array
// holds the times; a failure empties it as well.
template <class Shape>
Status Pulse(Handle out, int32_t length, double dt, double delay, Status checked, Shape shape) {
    Frame f;
    f.Output<double>(out);
    const int32_t given = Count(out);
    const bool timeArray = given > 0;
    Status s = checked;
    if (s == 0 && !timeArray && length < 1) s = EmptyArrayErr;
    if (s == 0 && !timeArray && !(dt > 0)) s = SampleIntervalErr;
    double* y = nullptr;
    if (s == 0) s = timeArray ? f.InPlace(out, &y) : f.Resize(out, length, &y) != 0 ? OutOfMemoryErr : 0;
    if (s == 0) {
        // The times stand for themselves: the grid's spacing and delay play no part.
        if (timeArray)
            shape(y, given, true, 1.0, 0.0);
        else
            shape(y, length, false, dt, delay);
    }
    return f.Finish(s);
}

bool Positive(double v) { return v > 0; }  // NaN is not

}  // namespace

TW_API int32_t SinePtrn(Array1DHandle out, int32_t* length, double* amplitude, double* phase, double* cycles,
                        int32_t* status) {
    return Pattern(out, *length, Length(*length), status,
                   [&](double* y, int32_t n) { SinePattern(y, n, *amplitude, *phase, *cycles); });
}

TW_API int32_t Square(Array1DHandle out, int32_t* length, double* amplitude, double* duty, double* cycles,
                      int32_t* status) {
    const int32_t n = *length;
    Status checked = Length(n);
    if (checked == 0 && !Positive(*duty)) checked = PeriodNotPositiveErr;
    if (checked == 0 && !(Positive(*cycles) && *cycles <= (n >> 1))) checked = DutyRangeErr;
    return Pattern(out, n, checked, status,
                   [&](double* y, int32_t m) { SquarePattern(y, m, *amplitude, *duty, *cycles); });
}

TW_API int32_t PulsePtrn(Array1DHandle out, int32_t* length, double* amplitude, int32_t* delay,
                         int32_t* width, int32_t* status) {
    const int32_t n = *length, d = *delay, w = *width;
    Status checked = Length(n);
    // Each alone first, so that their sum cannot overflow.
    if (checked == 0 && (d < 0 || w < 0 || d > n || w > n || d + w > n)) checked = DelayWidthRangeErr;
    return Pattern(out, n, checked, status,
                   [&](double* y, int32_t m) { PulsePattern(y, m, *amplitude, d, w); });
}

TW_API int32_t ImpulsePtrn(Array1DHandle out, int32_t* length, double* amplitude, int32_t* delay,
                           int32_t* status) {
    const int32_t n = *length, d = *delay;
    Status checked = Length(n);
    if (checked == 0 && (d < 0 || d >= n)) checked = IndexRangeErr;
    return Pattern(out, n, checked, status,
                   [&](double* y, int32_t m) { PulsePattern(y, m, *amplitude, d, 1); });
}

TW_API int32_t SincWave(Array1DHandle out, int32_t* length, double* amplitude, double* delay, double* dt,
                        int32_t* status) {
    Status checked = Length(*length);
    if (checked == 0 && !Positive(*dt)) checked = SampleIntervalErr;
    return Pattern(out, *length, checked, status,
                   [&](double* y, int32_t n) { SincPattern(y, n, *amplitude, *delay, *dt); });
}

TW_API int32_t RampPtrn(Array1DHandle out, int32_t* length, double* start, double* end, int32_t* status) {
    return ToPointer(status, RampPtrn80(out, *length, *start, *end, 0));
}

TW_API AnalysisStatus RampPtrn80(Array1DHandle out, int32_t length, double start, double end,
                                 int32_t excludeEnd) {
    return RampPtrn85(out, length, start, end, excludeEnd, 0);
}

TW_API AnalysisStatus RampPtrn85(Array1DHandle out, int32_t length, double start, double end,
                                 int32_t excludeEnd, uint32_t scale) {
    Status checked = 0;
    if (scale > 1)
        checked = InvalidSelectorErr;
    else if (excludeEnd == 1 && length < 1)
        checked = SamplesNotPositiveErr;
    else if (excludeEnd == 0 && length < 2 && !(length == 1 && start == end))
        checked = TooFewSamples2Err;
    else if (length < 1)
        checked = EmptyArrayErr;
    else if (scale == 1 && !(Positive(start) && Positive(end)))
        checked = BadDataRangeErr;
    return FillReturned<double>(out, length, checked, [&](Frame&, double* y, int32_t n) {
        Ramp(y, n, start, end, excludeEnd, scale);
        return Status{0};
    });
}

TW_API AnalysisStatus AperiodTriangleH(Array1DHandle out, int32_t length, double amplitude, double delay,
                                       double dt, double width, double skew) {
    Status checked = 0;
    if (!Positive(width))
        checked = BadDataRangeErr;
    else if (!(skew >= 0 && skew <= 1))
        checked = ProbabilityRangeErr;
    return Pulse(out, length, dt, delay, checked,
                 [&](double* y, int32_t n, bool times, double step, double shift) {
                     AperiodTriangle(y, n, times, step, shift, amplitude, width, skew);
                 });
}

TW_API AnalysisStatus GaussPulseH(Array1DHandle out, int32_t length, double amplitude, double delay,
                                  double dt, double centerFrequency, double bandwidth, double attenuation) {
    const bool ok = Positive(centerFrequency) && Positive(bandwidth) && Positive(attenuation);
    return Pulse(out, length, dt, delay, ok ? 0 : BadDataRangeErr,
                 [&](double* y, int32_t n, bool times, double step, double shift) {
                     GaussPulse(y, n, times, step, shift, amplitude, centerFrequency, bandwidth, attenuation);
                 });
}

TW_API AnalysisStatus GaussMonopulseH(Array1DHandle out, int32_t length, double dt, double delay,
                                      double centerFrequency, double amplitude) {
    return Pulse(out, length, dt, delay, Positive(centerFrequency) ? 0 : BadDataRangeErr,
                 [&](double* y, int32_t n, bool times, double step, double shift) {
                     GaussMonopulse(y, n, times, step, shift, centerFrequency, amplitude);
                 });
}

TW_API AnalysisStatus PeriodicSincH(Array1DHandle out, int32_t length, double amplitude, int32_t order,
                                    double dt, double delay) {
    return Pulse(out, length, dt, delay, order < 1 ? BadDataRangeErr : 0,
                 [&](double* y, int32_t n, bool times, double step, double shift) {
                     PeriodicSinc(y, n, times, step, shift, amplitude, order);
                 });
}
