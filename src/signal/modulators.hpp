// Complex, phase and frequency modulators that carry their state between blocks.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// x or y times exp(j (phase + w k)) by a rotation recursion, then phase advanced by n w and
// reduced to [0, 2 pi). For w of a nonzero frequency.
void ModulateComplex(cdouble* x, int32_t n, double w, double* phase);
void ModulateReal(const double* x, int32_t n, double w, double* phase, cdouble* y);

// n samples at x (any 4-byte alignment), replaced by the modulated carrier; n >= 1.
void PhaseModulate(int32_t n, double k, double* phase, double carrier, void* x, double* peak, double* acc);
void FrequencyModulate(int32_t n, double k, double* phase, double carrier, void* x, double* peak,
                       double* acc);

}  // namespace tw
