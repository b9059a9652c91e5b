// One waveform measurement by selector, for the fetch interface.
#pragma once

#include <cstdint>

#include "measure/pulse.hpp"

namespace tw {

// How many result slots a selector writes: 0 (outside the table), 1 (values[0]), 2 (values[0]
// and the time at values[2]) or 8 (a transition record in values[0..7]).
int32_t FetchSlots(int32_t selector);

// Writes the measurement to values, all 0 after a failure; *written as FetchSlots.
Status FetchMeasurement(int32_t selector, References refs, const LevelSettings& ls, int32_t polarity, double t0,
                        double dt, const double* x, int32_t n, double* values, int32_t* written);

}  // namespace tw
