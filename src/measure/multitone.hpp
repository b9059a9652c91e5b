// Frequency, amplitude and phase of the sine tones in a real record, refined below the bin width
// on a Hann-windowed spectrum with the window's kernel in closed form.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

struct MultitoneOutputs {
    int32_t found;
    double* frequencies;  // maxTones each
    double* amplitudes;
    double* phases;
    double* residual;  // n
    double* spectrum;  // (n + 1) / 2
    double dt, f0, df;
};

// sort 1: by amplitude, largest first; otherwise by frequency. residualMode 0 none, 1 the input,
// 2 the found tones, 3 input minus tones. Phases in degrees of A sin(2 pi f t + phase).
Status MultitoneCore(const double* x, int32_t n, double dt, int32_t sort, int32_t residualMode, double threshold,
                     int32_t maxTones, MultitoneOutputs* out);

}  // namespace tw
