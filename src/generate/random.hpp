// The uniform random source of the noise generators and shuffles (Wichmann-Hill), on a state the
// caller holds.
#pragma once

#include <cstdint>

#include "twanlys/generate.h"

namespace tw {

// Seed 0 leaves the state as it is; any other seed restarts the stream.
void RandomSeed(int32_t seed, RandomState* state);
// The seed rule of the generators: a negative seed continues the caller's stream.
inline void ApplySeed(int32_t seed, RandomState* state) {
    if (seed >= 0) RandomSeed(seed, state);
}
// In [0, 1).
double RandomUniform(RandomState* state);
// In 0 .. 32767 for a state reached from a seed below 12558384; may be negative for larger seeds.
int32_t RandomInt15(RandomState* state);

}  // namespace tw
