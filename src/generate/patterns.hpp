// One-shot patterns and analytic pulses on plain arrays. The frames have tested the parameters.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

void SinePattern(double* y, int32_t n, double amplitude, double phase, double cycles);
// Unipolar: amplitude for the first H samples of every period, 0.0 for the rest.
void SquarePattern(double* y, int32_t n, double amplitude, double duty, double cycles);
void PulsePattern(double* y, int32_t n, double amplitude, int32_t delay, int32_t width);
void SincPattern(double* y, int32_t n, double amplitude, double delay, double dt);
// scale 0 linear, 1 logarithmic (start and end positive). excludeEnd 0 ends on end exactly.
void Ramp(double* y, int32_t n, double start, double end, int32_t excludeEnd, uint32_t scale);

// The pulses, evaluated on the grid t = k dt - delay or, when timeArray, at the times y holds on
// entry (replaced by the shape).
void AperiodTriangle(double* y, int32_t n, bool timeArray, double dt, double delay, double amplitude,
                     double width, double skew);
void GaussPulse(double* y, int32_t n, bool timeArray, double dt, double delay, double amplitude, double fc,
                double bandwidth, double attenuation);
void GaussMonopulse(double* y, int32_t n, bool timeArray, double dt, double delay, double fc,
                    double amplitude);
void PeriodicSinc(double* y, int32_t n, bool timeArray, double dt, double delay, double amplitude,
                  int32_t order);

}  // namespace tw
