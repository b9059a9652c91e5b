// The cosine-sum windows: w[k] = sum over j of (-1)^j a[j] cos(2 pi j k / n), periodic.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// Multiplies x by the window in place; scaled divides the window by a[0], its coherent gain.
template <class T>
Status CosineSum(T* x, int32_t n, const double* a, int32_t m, bool scaled);

}  // namespace tw
