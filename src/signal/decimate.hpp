// Rate reduction by picking or block averaging, in one block or along a stream whose carry (the
// next offset, an unfinished group and its sum) is held by the caller.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// out[k] = x[k factor], or the mean of x[k factor .. (k + 1) factor - 1], for k below n / factor.
template <class T>
Status DecimateBlock(const T* x, int32_t n, int32_t factor, bool average, T* out);

template <class T>
struct DecimateCarry {
    int32_t offset;   // next sample to take, or start of the next full group (not negative)
    int32_t partial;  // samples of an unfinished group already summed
    T sum;            // their sum
};

// Outputs the next block of n samples gives (factor >= 1, offset >= 0).
template <class T>
int32_t DecimateStreamCount(int32_t n, int32_t factor, bool average, const DecimateCarry<T>& c);

// Writes DecimateStreamCount outputs and advances the carry.
template <class T>
void DecimateStream(const T* x, int32_t n, int32_t factor, bool average, DecimateCarry<T>* c, T* out);

}  // namespace tw
