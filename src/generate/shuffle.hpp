// In-place shuffles on the caller's RandomState, reporting the permutation applied.
#pragma once

#include <cstdint>

#include "twanlys/generate.h"

namespace tw {

// perm becomes the permutation of 0 .. n-1 that was applied to data (data may be null). algorithm
// 0 swaps every position with any position (n draws, not uniform: kept for old results); any
// other value is Fisher-Yates (n - 1 draws).
template <class T>
void Riffle(T* data, int32_t* perm, int32_t n, RandomState* st, int32_t algorithm);

}  // namespace tw
