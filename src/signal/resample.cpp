#include "signal/resample.hpp"

#include <algorithm>
#include <cmath>

namespace tw {

Status PlanRationalBlock(int32_t n, int32_t stateCount, int32_t l, int32_t m, int32_t taps, int32_t delay,
                         int32_t cells, RationalPlan* plan) {
    const int64_t c = (taps - 1) / 2, total = int64_t{stateCount} + n;
    const int64_t bracket = total * l - c - delay - 1;
    const int64_t count = bracket >= 0 ? bracket / m + 1 : 0;
    if (count > INT32_MAX) return OutOfMemoryErr;
    const int64_t next = delay + count * m;
    int64_t drop = 0;
    // With nothing to output, live state waits whole for more samples.
    if (count > 0 || stateCount == 0) {
        const int64_t q = next - c - 1;
        drop = q < 0 ? 0 : q / l + 1;
        // Only samples in hand can go, and none at or after the next instant: with taps below
        // 2 l - 1 the first sample the next output needs can lie past that instant, and
        // dropping up to it would leave a negative delay that the next block refuses.
        drop = std::min({drop, next / l, total});
    }
    const int64_t keep = total - drop;
    if (keep > cells) return DomainSingularityErr;
    *plan = {static_cast<int32_t>(count), drop, static_cast<int32_t>(keep),
             static_cast<int32_t>(next - drop * l)};
    return 0;
}

void PolyphaseSplit(const double* h, int32_t taps, int32_t l, double* poly, int32_t* start) {
    const int32_t phases = std::min(l, taps);
    int32_t at = 0;
    for (int32_t p = 0; p < phases; ++p) {
        start[p] = at;
        for (int64_t j = p; j < taps; j += l) poly[at++] = h[j];
    }
    start[phases] = at;
}

template <class T>
void RationalFilter(const T* v, const double* poly, const int32_t* start, int32_t taps, int32_t l, int32_t m,
                    int32_t delay, int32_t count, T* y) {
    const int64_t c = (taps - 1) / 2, phases = std::min(l, taps);
    const int64_t whole = m / l, rest = m % l;  // one output step as whole samples and phases
    const double gain = l;
    int64_t t = delay, i0 = 0, j0 = 0;
    for (int32_t k = 0; k < count; ++k, t += m) {
        // The first input i0 and first tap j0 follow from t; once t passes c they advance by the
        // step, without a division per output.
        if (t - c - 1 < 0) {
            i0 = 0;
            j0 = c - t;
        } else if (k == 0 || t - m - c - 1 < 0) {
            i0 = (t - c - 1) / l + 1;
            j0 = i0 * l - t + c;
        } else {
            i0 += whole;
            j0 -= rest;
            if (j0 < 0) j0 += l, ++i0;
        }
        const int64_t p = j0 % l;
        T sum{};
        if (p < phases) {
            const double* hp = poly + start[p] + j0 / l;
            const int64_t terms = poly + start[p + 1] - hp;
            const T* vp = v + i0;
            for (int64_t j = 0; j < terms; ++j) sum += hp[j] * vp[j];
        }
        y[k] = gain * sum;
    }
}

#define TW_RATIONAL(T)                                                                                  \
    template void RationalFilter<T>(const T*, const double*, const int32_t*, int32_t, int32_t, int32_t, \
                                    int32_t, int32_t, T*);
TW_RATIONAL(double)
TW_RATIONAL(cdouble)
#undef TW_RATIONAL

namespace {

// The table at position p: the cell at trunc(p), or linear between it and the next; the last
// cell stands alone (which also catches a last position rounded past it).
double TableValue(const Table& t, double p) {
    const int64_t last = t.size - 1;
    const int64_t j = std::max<int64_t>(0, static_cast<int64_t>(p));
    if (j >= last) return t.cells[last];
    if (t.interpolation == 1) return t.cells[j];
    return t.cells[j] + (p - static_cast<double>(j)) * (t.cells[j + 1] - t.cells[j]);
}

double TableStep(const Table& t, double r) {
    if (!(r >= 1)) r = 1;  // NaN too
    if (r > t.oversample) r = t.oversample;
    return t.oversample / r;
}

}  // namespace

TablePositions TableReach(const Table& t, double r, double f) {
    const double s = TableStep(t, r), half = (t.size - 1) / 2.0;
    return {static_cast<int32_t>(std::floor((half - s * f) / s)),
            static_cast<int32_t>(std::floor((s * f + half) / s)), s};
}

TablePositions TableCoefficients(const Table& t, double r, double f, double* coef) {
    const TablePositions p = TableReach(t, r, f);
    const double half = (t.size - 1) / 2.0;
    // The cell at position [0, s) belongs to a sample that is not used.
    const double first = (half - p.scale * f) - (p.left - 1) * p.scale;
    for (int32_t m = 0; m < p.left + p.right; ++m) coef[m] = TableValue(t, first + m * p.scale);
    return p;
}

int32_t TableWidth(const Table& t, double r) {
    const TablePositions p = TableReach(t, r, 0.0);
    return std::max(0, p.left + 1 + p.right);
}

template <class T>
T TableOutput(const T* v, int64_t i, const TablePositions& p, const double* coef) {
    const int32_t taps = p.left + p.right;
    T sum{};
    for (int32_t m = 0; m < taps && i + p.right - m >= 0; ++m) sum += coef[taps - 1 - m] * v[i + p.right - m];
    return p.scale * sum;
}

template double TableOutput<double>(const double*, int64_t, const TablePositions&, const double*);
template cdouble TableOutput<cdouble>(const cdouble*, int64_t, const TablePositions&, const double*);

template <class T>
Status ResampleConstBlock(const Table& t, double filterRatio, const T* v, int64_t total, ConstResampler* st,
                          double* coef, int32_t coefCells, T* y, int32_t capacity, int32_t* produced,
                          int64_t* drop) {
    *produced = 0;
    *drop = 0;
    const auto recompute = [&]() -> Status {
        const TablePositions reach = TableReach(t, filterRatio, st->frac);
        if (reach.left + reach.right > coefCells) return BufferTooSmallErr;
        const TablePositions p = TableCoefficients(t, filterRatio, st->frac, coef);
        st->left = p.left, st->right = p.right, st->scale = p.scale;
        return 0;
    };
    double t0 = st->index + st->frac;
    if (t0 < 0) {
        st->index = st->count - 1;
        st->frac = 0;
        t0 = st->index;
    }
    if (const Status s = recompute()) return s;
    while (st->index + int64_t{st->right} <= total - 1) {
        if (*produced == capacity) return ResampleSizeErr;
        y[(*produced)++] = TableOutput(v, st->index, {st->left, st->right, st->scale}, coef);
        const double next = *produced * st->ratio + t0;
        // The state keeps an i32 index: absurd ratios saturate rather than overflow, and a
        // saturated index keeps fraction 0 (the filter stays within the table).
        const double down = std::floor(next);
        const double whole = std::clamp(down, -2147483648.0, 2147483647.0);
        const double frac = whole == down ? next - whole : 0.0;
        st->index = static_cast<int32_t>(whole);
        if (frac != st->frac) {
            st->frac = frac;
            if (const Status s = recompute()) return s;
        }
    }
    // Samples before the first one the next output reads go; the rest waits in the buffer.
    *drop = std::clamp<int64_t>(int64_t{st->index} - st->left + 1, 0, total);
    st->index = static_cast<int32_t>(st->index - *drop);
    return 0;
}

template <class T>
Status ResampleVariableBlock(const Table& t, bool antiAlias, const T* x, int32_t rows, int32_t n,
                             const double* times, int32_t m, double last, T* out, VariableResult* result) {
    // The largest gap, at least 1, sizes the coefficients; without anti-aliasing every filter is
    // the narrowest.
    double widest = 1, previous = last;
    for (int32_t j = 0; antiAlias && j < m; ++j) {
        widest = std::max(widest, times[j] - previous);
        previous = times[j];
    }
    Scratch<double> coef;
    if (const Status s = coef.Allocate(static_cast<size_t>(std::max(1, TableWidth(t, widest))))) return s;
    *result = {0, 0, last};
    previous = last;
    for (int32_t j = 0; j < m; ++j) {
        const double p = times[j];
        if (!(p > -1e9 && p < 1e9)) break;  // no sample reaches it
        const double whole = std::floor(p), f = p - whole;
        const int64_t index = static_cast<int64_t>(whole);
        const TablePositions pos = TableCoefficients(t, antiAlias ? p - previous : 1.0, f, coef.get());
        // Measured with the widest filter of the call, so that no later output of it misses samples.
        result->consumed = static_cast<int32_t>(
            std::clamp<int64_t>(index - TableReach(t, widest, f).left + 1, INT32_MIN, INT32_MAX));
        if (index + pos.right > n - 1) break;
        for (int32_t r = 0; r < rows; ++r)
            out[static_cast<size_t>(r) * static_cast<size_t>(m) + static_cast<size_t>(j)] =
                TableOutput(x + static_cast<size_t>(r) * static_cast<size_t>(n), index, pos, coef.get());
        result->last = previous = p;
        ++result->done;
    }
    result->consumed = std::clamp(result->consumed, 0, n);
    return coef.Release();
}

#define TW_TABLE(T)                                                                                          \
    template Status ResampleConstBlock<T>(const Table&, double, const T*, int64_t, ConstResampler*, double*, \
                                          int32_t, T*, int32_t, int32_t*, int64_t*);                         \
    template Status ResampleVariableBlock<T>(const Table&, bool, const T*, int32_t, int32_t, const double*,  \
                                             int32_t, double, T*, VariableResult*);
TW_TABLE(double)
TW_TABLE(cdouble)
#undef TW_TABLE

}  // namespace tw
