// Discrete Zak transform: for each phase m of a decimation by M, the length-N DFT of the samples
// x[m + j M], summed into one output with the phase factors exp(-2 pi i m (q0 + q) / (M N)).
#pragma once

#include <cstdint>

#include "frame/frame.hpp"
#include "transform/fft/fft.hpp"

namespace tw {

// y gets outLength values; element q reads bin (p + q) mod N, p = offset mod N taken non-negative.
// A record longer than T = M N is first folded into its first T samples, in place, from x[N] on.
// T is double (real x) or cdouble. The table has length N.
template <class T>
Status ZakTransform(const FftTable* table, T* x, int32_t n, int32_t M, int32_t N, int32_t offset,
                    cdouble* y, int32_t outLength);

}  // namespace tw
