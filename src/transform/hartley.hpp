// Hartley and Hilbert transforms of real sequences, in place, from the half-complex output of the
// real FFT (no kernels of their own). The table has length n.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"
#include "transform/fft/fft.hpp"

namespace tw {

// H[k] = Re X[k] - Im X[k]; the inverse is the same transform times 1/n.
Status HartleyTransform(const FftTable* table, double* x, int32_t n, bool inverse);

// The spectrum times -i (DC and, for even n, Nyquist cleared), transformed back; the inverse is
// its negation.
Status HilbertTransform(const FftTable* table, double* x, int32_t n, bool inverse);

}  // namespace tw
