// Compact storage: columns of the row-major matrix, lower (kind 0 and 2) from the diagonal down,
// upper (kind 1) from row 0 to the diagonal.
#include <cmath>

#include "matrix/decompose.hpp"

namespace tw {

Status CompactOrder(int32_t length, int32_t* n) {
    const auto order = static_cast<int32_t>((std::sqrt(8.0 * length + 1.0) - 1) / 2);
    *n = order;
    return static_cast<int64_t>(order) * (order + 1) / 2 == length ? 0 : NotSquareErr;
}

template <class T>
void PackCompact(const T* a, int32_t n, int32_t kind, T* compact) {
    size_t k = 0;
    for (int32_t j = 0; j < n; ++j) {
        const int32_t from = kind == 1 ? 0 : j, to = kind == 1 ? j : n - 1;
        for (int32_t i = from; i <= to; ++i) compact[k++] = a[static_cast<size_t>(i) * n + j];
    }
}

template <class T>
void ExpandCompact(const T* compact, int32_t n, int32_t kind, T* a) {
    const auto A = [&](int32_t i, int32_t j) -> T& { return a[static_cast<size_t>(i) * n + j]; };
    size_t k = 0;
    for (int32_t j = 0; j < n; ++j) {
        const int32_t from = kind == 1 ? 0 : j, to = kind == 1 ? j : n - 1;
        for (int32_t i = 0; i < n; ++i) {
            if (i >= from && i <= to)
                A(i, j) = compact[k++];
            else if (kind != 2)
                A(i, j) = 0;
        }
    }
    if (kind == 2)
        for (int32_t i = 0; i < n; ++i)
            for (int32_t j = i + 1; j < n; ++j) A(i, j) = Conj(A(j, i));
}

template void PackCompact<double>(const double*, int32_t, int32_t, double*);
template void PackCompact<cdouble>(const cdouble*, int32_t, int32_t, cdouble*);
template void ExpandCompact<double>(const double*, int32_t, int32_t, double*);
template void ExpandCompact<cdouble>(const cdouble*, int32_t, int32_t, cdouble*);

}  // namespace tw
