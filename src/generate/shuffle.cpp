#include "generate/shuffle.hpp"

#include <cmath>
#include <complex>
#include <utility>

#include "generate/random.hpp"

namespace tw {
namespace {

// floor(U m) for U in [0, 1); the clamp only guards the rounding of U m at the top.
int32_t Below(RandomState* st, int32_t m) {
    const auto j = static_cast<int32_t>(std::floor(RandomUniform(st) * m));
    return j < m ? j : m - 1;
}

}  // namespace

template <class T>
void Riffle(T* data, int32_t* perm, int32_t n, RandomState* st, int32_t algorithm) {
    for (int32_t i = 0; i < n; ++i) perm[i] = i;
    const auto swap = [&](int32_t i, int32_t j) {
        std::swap(perm[i], perm[j]);
        if (data != nullptr) std::swap(data[i], data[j]);
    };
    if (algorithm == 0) {
        for (int32_t i = 0; i < n; ++i) swap(i, Below(st, n));
    } else {
        for (int32_t i = n - 1; i >= 1; --i) swap(i, Below(st, i + 1));
    }
}

template void Riffle<double>(double*, int32_t*, int32_t, RandomState*, int32_t);
template void Riffle<int32_t>(int32_t*, int32_t*, int32_t, RandomState*, int32_t);
template void Riffle<std::complex<double>>(std::complex<double>*, int32_t*, int32_t, RandomState*, int32_t);

}  // namespace tw
