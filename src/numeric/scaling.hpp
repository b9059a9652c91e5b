// Whole-array transformations in place: range and peak scaling, linear evaluation,
// normalisation and the polar pair. n is at least 1.
#pragma once

#include <cstdint>

namespace tw {

// To [-1, 1] about the middle of the range, NaN skipped. Constant data only lose the offset
// (scale 1); all-NaN data stay, with offset and scale NaN.
void RangeScale(double* x, int32_t n, double* offset, double* scale);
// Divides by the largest magnitude unless that is 0.
void PeakScale(double* x, int32_t n, double* peak);
void LinearEvaluate(double* x, int32_t n, double multiplier, double offset);
// Zero mean and unit population deviation; a deviation of 0 leaves Infinity or NaN.
void Normalise(double* x, int32_t n, double* deviation, double* mean);
// (x, y) becomes (magnitude, phase), and back.
void RectToPolar(double* x, double* y, int32_t n);
void PolarToRect(double* magnitude, double* phase, int32_t n);

}  // namespace tw
