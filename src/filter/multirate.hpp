// Streaming FIR engines: plain, interpolating (polyphase), decimating (transposed form) and
// rational, over f64, f32 and their complex forms with real taps. Past inputs or running
// accumulators live in the caller's state; `delay` outputs are still to be dropped.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

enum MultiRateMode : int32_t { kPlain = 0, kInterpolate = 1, kDecimate = 2, kRational = 3 };

// Cells of state per mode: taps - 1; ceil(taps / L); ceil(taps / M) + 1; ceil(taps / L).
int64_t MultiRateStateLength(int32_t mode, int32_t taps, int32_t L, int32_t M);

// Outputs a block of n inputs yields after the delay, clipped at 0. counter: the decimating
// counter (in 0 .. M - 1) of modes 2 and 3.
int64_t MultiRateOutputs(int32_t mode, int32_t n, int32_t L, int32_t M, int32_t delay, int32_t counter);

// One block. state has MultiRateStateLength cells (the decimator's accumulators first); *counter
// is in 0 .. M - 1 and is advanced in modes 2 and 3; *delay falls by the output opportunities of
// the block, down to 0. y gets MultiRateOutputs samples. Gain is not applied in mode 2. The
// accumulation is in the precision of R.
template <class T, class R>
Status MultiRateFir(int32_t mode, const T* x, int32_t n, const R* h, int32_t taps, int32_t L, int32_t M, R gain,
                    T* state, int32_t* delay, int32_t* counter, T* y);

// The model stage of a narrowband filter as a stream: h stretched by L, no rate change. state has
// (taps - 1) L past inputs, oldest first; y gets max(0, n - delay) samples.
Status StretchedFir(const double* x, int32_t n, const double* h, int32_t taps, int32_t L, double gain,
                    double* state, int32_t* delay, double* y);

}  // namespace tw
