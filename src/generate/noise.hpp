// Noise generators on plain arrays, drawing from the caller's RandomState. Seeding is the
// caller's business: these only draw.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"
#include "twanlys/generate.h"

namespace tw {

// Consecutive rejections after which a sampler gives up with NoConvergenceErr. A working stream
// is accepted within a few tries; only a record stuck at zero, or parameters beyond what f64
// resolves, come near it.
inline constexpr int32_t kMaxRejections = 100000;

void WhiteNoise(double* y, int32_t n, double amplitude, RandomState* st);
Status GaussNoise(double* y, int32_t n, double deviation, RandomState* st, GaussSpare* spare);
// order >= 1, mean >= 0, trials >= 0 and probability in [0, 1]: the frames test them.
Status GammaNoise(double* y, int32_t n, int32_t order, RandomState* st);
Status PoissonNoise(double* y, int32_t n, double mean, RandomState* st);
Status BinomialNoise(uint32_t* y, int32_t n, int32_t trials, double probability, RandomState* st,
                     BinomialCache* cache);
// Scratch and table failures as statuses; n >= 1.
Status PeriodicNoise(double* y, int32_t n, double amplitude, RandomState* st);

}  // namespace tw
