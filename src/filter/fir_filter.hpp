// The two-stage narrowband filter over one block: image filter, then the model filter stretched
// by L, with the input added at the centre for the complementary classes.
#pragma once

#include <complex>
#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

struct NarrowbandTaps {
    int32_t filterClass;
    int32_t L;
    const double* model;
    int32_t nModel;
    const double* image;
    int32_t nImage;
};

// Output length of a block of n samples.
int64_t NarrowbandLength(const NarrowbandTaps& f, int32_t n);

Status NarrowbandFilter(const NarrowbandTaps& f, const double* x, int32_t n, double* y);
// Real and imaginary parts in turn, each through the real filter.
Status CxNarrowbandFilter(const NarrowbandTaps& f, const std::complex<double>* x, int32_t n,
                          std::complex<double>* y);

}  // namespace tw
