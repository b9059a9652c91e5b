// Equiripple linear-phase FIR design: the Remez exchange of McClellan, Parks and Rabiner.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

enum EquirippleKind : int32_t { kMultiband = 0, kDifferentiator = 1, kHilbert = 2 };

// One band of a design, in the caller's units of frequency.
struct EquirippleBand {
    double gain;
    double lower;
    double upper;
    double weight;
};

// Designs `taps` (at least 1) coefficients into h. The checks from taps below 3 onwards are made
// here. *deviation gets the levelled weighted error; it is left alone on refusal and holds the
// last value (0 before any exchange) when the iteration limit ran out, signalled by *ranOut.
Status EquirippleDesign(int32_t taps, double fs, const EquirippleBand* bands, int32_t nBands, int32_t kind,
                        int32_t limit, double* h, double* deviation, bool* ranOut);

}  // namespace tw
