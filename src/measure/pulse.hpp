// Pulse, transition and cycle measurements on mid-level crossings with hysteresis.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// Reference levels; units non-zero means percent of the amplitude between the state levels.
// The cores leave them in absolute units (0 after a failure).
struct References {
    double high, mid, low;
    uint16_t units;
};

// How the state levels are found, with the bins the histogram counts into.
struct LevelSettings {
    int32_t method;
    int32_t bins;
    int32_t* counters;
    int32_t strict;
};

// The references in absolute units and the hysteresis, with the checks every measurement makes.
Status ReferenceLevels(const double* x, int32_t n, double t0, double dt, References* refs, const LevelSettings& ls,
                       double* hysteresis);

struct Crossing {
    double position;  // in samples, plus t0
    int32_t direction;  // 1 rising, 0 falling
    int32_t index;  // the sample behind the crossing
};

// Crossings of mid with hysteresis h, at most `capacity` of them into `list`. startArmed also
// counts a first crossing met before either band was reached.
int32_t FindCrossings(const double* x, int32_t n, double t0, double mid, double h, bool startArmed,
                      Crossing* list, int32_t capacity);

struct PulseResult {
    double period, width, duty, centre;
};
// polarity -1: crossings 2N-2 to 2N-1; 0 or 1: the N-th pulse that starts with a crossing of that
// direction.
Status PulseCore(const double* x, int32_t n, double t0, double dt, int32_t polarity, bool unbounded,
                 int32_t number, References* refs, const LevelSettings& ls, PulseResult* out);

struct TransitionResult {
    double slewRate, duration, start, end, preshoot, preshootTime, overshoot, overshootTime;
};
// polarity 1 rising, 0 falling, -1 either.
Status TransitionCore(const double* x, int32_t n, double t0, double dt, int32_t polarity, int32_t number,
                      References* refs, const LevelSettings& ls, TransitionResult* out);

struct CycleResult {
    double rms, mean;
};
Status CycleCore(const double* x, int32_t n, double t0, double dt, int32_t number, References* refs,
                 const LevelSettings& ls, CycleResult* out);

}  // namespace tw
