// In-place ascending sorts shared by the families that need order statistics (median filter,
// least-absolute-residual fits, statistics mode).
//
// Quicksort with a median-of-three pivot and insertion sort for segments of at most 7 elements.
// The larger segment of each partition waits on an explicit stack while the smaller one is
// sorted, so the stack never holds more than log2(n) segments. NaN keys go to the front; the
// order of equal keys is not kept.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// Always 0: the internal stack is deep enough for any i32 length.
Status SortAscending(double* x, int32_t n);

// Sorts key and moves carried along with it. stackCapacity counts stack words, two per waiting
// segment (its first and last index); a partition that would need more is -20075
// BufferTooSmallErr, and the arrays are then left partly sorted.
Status SortAscendingPaired(double* key, double* carried, int32_t n, int32_t stackCapacity);

}  // namespace tw
