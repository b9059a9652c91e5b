// Non-recursive smoothers on one block: Savitzky-Golay least-squares polynomial smoothing and a
// running median with zero padding.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// The argument checks of both Savitzky-Golay exports in their order; n is the signal length, or
// -1 when there is no signal.
Status SavitzkyGolayArguments(int32_t order, int32_t frame, int32_t weightCount, int32_t n);

// The frame by frame smoothing matrix h and, when k is not null, the order + 1 by frame matrix of
// polynomial coefficients. weights is null or holds frame entries, used by magnitude.
Status SavitzkyGolayDesign(int32_t order, int32_t frame, const double* weights, double* h, double* k);

// y = x smoothed with the rows of h: the centre row inside, the first and last frames' rows at the
// ends. n is at least frame; y must not overlap x.
void SavitzkyGolaySmooth(const double* x, int32_t n, const double* h, int32_t frame, double* y);

// The running median in place over left + 1 + right samples, zero outside x. Requires left >= 0
// and right < n (right may be negative only when n is 0).
Status MedianFilter(double* x, int32_t n, int32_t left, int32_t right);

}  // namespace tw
