// Multichannel level triggers and single-pulse parameters on plain arrays.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// Per-channel settings; channels past the end of an array take level 0, hysteresis 0, slope 1.
struct TriggerSettings {
    const double* level;
    int32_t nLevel;
    const double* hysteresis;
    int32_t nHysteresis;
    const int32_t* slope;
    int32_t nSlope;
};

// x holds one channel per row. armed (rows) comes in and goes out; indices (rows x maximum),
// counts and found (rows) are written over fully.
void TriggerChannels(const double* x, int32_t rows, int32_t cols, const TriggerSettings& t, int32_t* armed,
                     int32_t maximum, int32_t* indices, int32_t* counts, int32_t* found);

// The older layout: a channel starts armed when its previous last sample satisfies the arming
// condition (unarmed if there is none), and the indices of all channels share one packed array of
// nIndices cells (zeroed by the caller), of which only the first 50 take triggers.
void TriggerChannelsPacked(const double* x, int32_t rows, int32_t cols, const TriggerSettings& t,
                           const double* previous, int32_t nPrevious, int32_t maximum, int32_t* indices,
                           int32_t nIndices, int32_t* counts, int32_t* found, double* last);

struct PulseResults {
    double top, base, amplitude, delay, width, slew, fall, rise, overshoot, undershoot;
};

// n >= 1.
PulseResults MeasurePulse(const double* x, int32_t n);

}  // namespace tw
