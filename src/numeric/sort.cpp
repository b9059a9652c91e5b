#include "numeric/sort.hpp"

#include <cmath>
#include <utility>

namespace tw {
namespace {

constexpr int32_t kInsertionMax = 7;
// Two words per waiting segment, one segment per halving of an i32 length.
constexpr int32_t kStackWords = 2 * 32;

// The carried array is optional: Arrays<false> compiles the plain sort without its moves.
template <bool Paired>
struct Arrays {
    double* key;
    double* carried;
    void Swap(int32_t a, int32_t b) const {
        std::swap(key[a], key[b]);
        if constexpr (Paired) std::swap(carried[a], carried[b]);
    }
};

// Moves NaN keys to the front and returns how many there are.
template <bool Paired>
int32_t NaNToFront(const Arrays<Paired>& a, int32_t n) {
    int32_t front = 0;
    for (int32_t i = 0; i < n; ++i)
        if (std::isnan(a.key[i])) a.Swap(i, front++);
    return front;
}

template <bool Paired>
void InsertionSort(const Arrays<Paired>& a, int32_t lo, int32_t hi) {
    for (int32_t j = lo + 1; j <= hi; ++j) {
        const double k = a.key[j];
        double c = 0;
        if constexpr (Paired) c = a.carried[j];
        int32_t i = j - 1;
        for (; i >= lo && a.key[i] > k; --i) {
            a.key[i + 1] = a.key[i];
            if constexpr (Paired) a.carried[i + 1] = a.carried[i];
        }
        a.key[i + 1] = k;
        if constexpr (Paired) a.carried[i + 1] = c;
    }
}

template <bool Paired>
Status Quicksort(const Arrays<Paired>& a, int32_t first, int32_t last, int32_t capacity) {
    int32_t stack[kStackWords];
    int32_t top = 0;
    int32_t lo = first, hi = last;
    for (;;) {
        if (hi - lo < kInsertionMax) {
            InsertionSort(a, lo, hi);
            if (top == 0) return 0;
            hi = stack[--top];
            lo = stack[--top];
            continue;
        }
        // Median of lo, mid, hi ends at lo + 1 with the smaller at lo and the larger at hi,
        // which also serve as sentinels for the two scans.
        const int32_t mid = lo + (hi - lo) / 2;
        a.Swap(mid, lo + 1);
        if (a.key[lo] > a.key[hi]) a.Swap(lo, hi);
        if (a.key[lo + 1] > a.key[hi]) a.Swap(lo + 1, hi);
        if (a.key[lo] > a.key[lo + 1]) a.Swap(lo, lo + 1);
        const double pivot = a.key[lo + 1];
        int32_t i = lo + 1, j = hi;
        for (;;) {
            do ++i; while (a.key[i] < pivot);
            do --j; while (a.key[j] > pivot);
            if (j < i) break;
            a.Swap(i, j);
        }
        a.Swap(lo + 1, j);
        if (top + 2 > capacity || top + 2 > kStackWords) return BufferTooSmallErr;
        if (hi - i + 1 >= j - lo) {
            stack[top++] = i;
            stack[top++] = hi;
            hi = j - 1;
        } else {
            stack[top++] = lo;
            stack[top++] = j - 1;
            lo = i;
        }
    }
}

}  // namespace

Status SortAscending(double* x, int32_t n) {
    const Arrays<false> a{x, nullptr};
    return n < 2 ? 0 : Quicksort(a, NaNToFront(a, n), n - 1, kStackWords);
}

Status SortAscendingPaired(double* key, double* carried, int32_t n, int32_t stackCapacity) {
    const Arrays<true> a{key, carried};
    return n < 2 ? 0 : Quicksort(a, NaNToFront(a, n), n - 1, stackCapacity);
}

}  // namespace tw
