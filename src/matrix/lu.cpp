// Crout LU with partial pivoting and the solves built on it.
#include <algorithm>
#include <cstring>
#include <utility>

#include "frame/frame.hpp"
#include "matrix/decompose.hpp"

namespace tw {

namespace {

// Pivots of the real core are ranked by |x|, of the complex one by |z|^2.
inline double PivotSize(double x) { return std::fabs(x); }
inline double PivotSize(cdouble z) { return Abs2(z); }

}  // namespace

template <class T>
Status LuFactor(T* a, int32_t m, int32_t n, int32_t* perm, int32_t* parity) {
    if constexpr (kIsComplex<T>) {
        if (Screen(a, m * n)) return NanInfErr;
    }
    const auto at = [&](int32_t i, int32_t j) -> T& { return a[static_cast<size_t>(i) * n + j]; };
    for (int32_t i = 0; i < m; ++i) perm[i] = i;
    *parity = 0;
    Status status = 0;
    for (int32_t j = 0; j < n; ++j) {
        for (int32_t i = 1; i < std::min(j, m); ++i) {
            T sum = at(i, j);
            for (int32_t k = 0; k < i; ++k) sum -= at(i, k) * at(k, j);
            at(i, j) = sum;
        }
        // Columns beyond the last row of a wide matrix have no pivot to find.
        if (j >= m) continue;
        double best = 0;
        int32_t pivot = -1;
        for (int32_t i = j; i < m; ++i) {
            T sum = at(i, j);
            for (int32_t k = 0; k < j; ++k) sum -= at(i, k) * at(k, j);
            at(i, j) = sum;
            // Strictly greater: ties keep the first row, and NaN never wins.
            if (PivotSize(sum) > best) best = PivotSize(sum), pivot = i;
        }
        if (pivot < 0) {
            status = SingularPivotWarn;
            continue;
        }
        if (pivot != j) {
            std::swap_ranges(&at(pivot, 0), &at(pivot, 0) + n, &at(j, 0));
            perm[j] = perm[pivot];
            *parity ^= 1;
        }
        const T d = at(j, j);
        for (int32_t i = j + 1; i < m; ++i) at(i, j) = Divide(at(i, j), d);
    }
    return status;
}

template <class T>
Status LuSolve(const T* lu, const int32_t* perm, T* b, int32_t n, T* x) {
    if (x == nullptr) x = b;
    if (x != b) std::memcpy(x, b, static_cast<size_t>(n) * sizeof(T));
    for (int32_t i = 0; i < n; ++i)
        if (perm[i] != i) std::swap(x[i], x[perm[i]]);
    for (int32_t i = 1; i < n; ++i) {
        const T* row = lu + static_cast<size_t>(i) * n;
        T sum = x[i];
        for (int32_t k = 0; k < i; ++k) sum -= row[k] * x[k];
        x[i] = sum;
    }
    for (int32_t i = n - 1; i >= 0; --i) {
        const T* row = lu + static_cast<size_t>(i) * n;
        if (row[i] == T(0)) return SingularMatrixErr;
        T sum = x[i];
        for (int32_t k = i + 1; k < n; ++k) sum -= row[k] * x[k];
        x[i] = Divide(sum, row[i]);
    }
    return 0;
}

template <class T>
Status LuInverse(const T* lu, const int32_t* perm, int32_t n, T* inv) {
    const size_t nn = static_cast<size_t>(n) * n;
    Scratch<T> copy, column;
    if (column.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    if (inv == lu) {
        if (copy.Allocate(nn) != 0) return OutOfMemoryErr;
        std::memcpy(copy.get(), lu, nn * sizeof(T));
        lu = copy.get();
    }
    Status s = 0;
    for (int32_t j = 0; j < n && s == 0; ++j) {
        std::fill(column.get(), column.get() + n, T(0));
        column[j] = 1;
        s = LuSolve(lu, perm, column.get(), n, static_cast<T*>(nullptr));
        for (int32_t i = 0; i < n; ++i) inv[static_cast<size_t>(i) * n + j] = column[i];
    }
    return MergeRelease(MergeRelease(s, copy.Release()), column.Release());
}

#define TW_LU(T)                                                                    \
    template Status LuFactor<T>(T*, int32_t, int32_t, int32_t*, int32_t*);         \
    template Status LuSolve<T>(const T*, const int32_t*, T*, int32_t, T*);         \
    template Status LuInverse<T>(const T*, const int32_t*, int32_t, T*);
TW_LU(double)
TW_LU(cdouble)
#undef TW_LU

}  // namespace tw
