#include "signal/decimate.hpp"

#include <algorithm>

#include "stats/descriptive.hpp"

namespace tw {

template <class T>
Status DecimateBlock(const T* x, int32_t n, int32_t factor, bool average, T* out) {
    const int32_t count = n / factor;
    for (int32_t k = 0; k < count; ++k) {
        const T* group = x + static_cast<int64_t>(k) * factor;
        if (!average) {
            out[k] = group[0];
        } else if constexpr (std::is_same_v<T, double>) {
            if (const Status s = Mean(group, factor, &out[k])) return s;
        } else {
            T sum{};
            for (int32_t i = 0; i < factor; ++i) sum += group[i];
            out[k] = sum / static_cast<double>(factor);
        }
    }
    return 0;
}

namespace {

// Whole groups between `start` and the end of the block. The count (b + n) / factor agrees with
// the groups that fit while offset + partial = factor; a carry that breaks that cannot make the
// routine read past x.
int32_t WholeGroups(int64_t start, int32_t n, int32_t factor) {
    return start <= n ? static_cast<int32_t>((n - start) / factor) : 0;
}

}  // namespace

template <class T>
int32_t DecimateStreamCount(int32_t n, int32_t factor, bool average, const DecimateCarry<T>& c) {
    if (!average) return c.offset < n ? (n - c.offset - 1) / factor + 1 : 0;
    const int64_t b = c.partial != 0 ? int64_t{c.partial} : -int64_t{c.offset};
    if (b + n < factor) return 0;  // also a negative b + n: nothing completes
    const int32_t groups = static_cast<int32_t>((b + n) / factor);
    const int32_t safe = c.partial != 0 ? (c.offset <= n ? 1 + WholeGroups(c.offset, n, factor) : 0)
                                        : WholeGroups(c.offset, n, factor);
    return std::min(groups, safe);
}

template <class T>
void DecimateStream(const T* x, int32_t n, int32_t factor, bool average, DecimateCarry<T>* c, T* out) {
    const int32_t count = DecimateStreamCount(n, factor, average, *c);
    if (!average) {
        for (int32_t k = 0; k < count; ++k) out[k] = x[c->offset + static_cast<int64_t>(k) * factor];
        // One update covers both cases: with no output it is offset - n.
        c->offset = static_cast<int32_t>(c->offset + static_cast<int64_t>(count) * factor - n);
        return;
    }
    const double divisor = factor;
    if (count > 0) {
        int32_t k = 0;
        if (c->partial != 0) {
            T sum = c->sum;
            for (int32_t i = 0; i < c->offset; ++i) sum += x[i];
            out[k++] = sum / divisor;
        }
        int64_t pos = c->offset;
        for (; k < count; ++k) {
            T sum{};
            for (int32_t i = 0; i < factor; ++i) sum += x[pos++];
            out[k] = sum / divisor;
        }
        T rest{};
        for (int64_t i = pos; i < n; ++i) rest += x[i];
        const int32_t r = static_cast<int32_t>(n - pos);
        c->sum = rest;
        c->partial = r;
        c->offset = (factor - r) % factor;
    } else if (c->partial != 0) {
        for (int32_t i = 0; i < n; ++i) c->sum += x[i];
        c->partial = static_cast<int32_t>(std::min<int64_t>(int64_t{c->partial} + n, INT32_MAX));
        c->offset = std::max(0, c->offset - n);
    } else if (c->offset < n) {
        T sum{};
        for (int32_t i = c->offset; i < n; ++i) sum += x[i];
        c->sum = sum;
        c->partial = n - c->offset;
        c->offset = factor - c->partial;
    } else {
        c->offset -= n;
    }
}

#define TW_DECIMATE(T)                                                                        \
    template Status DecimateBlock<T>(const T*, int32_t, int32_t, bool, T*);                   \
    template int32_t DecimateStreamCount<T>(int32_t, int32_t, bool, const DecimateCarry<T>&); \
    template void DecimateStream<T>(const T*, int32_t, int32_t, bool, DecimateCarry<T>*, T*);
TW_DECIMATE(double)
TW_DECIMATE(cdouble)
#undef TW_DECIMATE

}  // namespace tw
