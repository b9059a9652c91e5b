#include "filter/multirate.hpp"

#include <algorithm>
#include <complex>
#include <numeric>
#include <type_traits>

namespace tw {

namespace {

int64_t CeilDiv(int64_t a, int64_t b) { return a <= 0 ? 0 : (a + b - 1) / b; }

// Outputs computed side by side: enough independent sums to hide the latency of the additions,
// each still summed in order of k, so that every output rounds as a lone dot product would.
// (Measured: four doubles side by side, and 128 bytes of the other types.)
template <class T, int64_t XS>
inline constexpr int kLanes = XS != 1 ? 4 : std::is_same_v<T, double> ? 4 : static_cast<int>(128 / sizeof(T));

// y[o ys] = scale * sum_k h[k] v[base + o xs - k] for o in [0, count).
template <class T, class R, int64_t XS>
void Lanes(const T* v, int64_t base, int64_t xs, const R* h, int32_t taps, R scale, T* y, int64_t ys, int64_t count) {
    constexpr int B = kLanes<T, XS>;
    const int64_t step = XS > 0 ? XS : xs;
    int64_t o = 0;
    for (; o + B <= count; o += B) {
        T a[B] = {};
        const T* q = v + base + o * step;
        for (int32_t k = 0; k < taps; ++k) {
            const R hk = h[k];
            const T* p = q - k;
            for (int u = 0; u < B; ++u) a[u] += hk * p[u * step];
        }
        for (int u = 0; u < B; ++u) y[(o + u) * ys] = scale * a[u];
    }
    for (; o < count; ++o) {
        T a{};
        const T* q = v + base + o * step;
        for (int32_t k = 0; k < taps; ++k) a += h[k] * q[-k];
        y[o * ys] = scale * a;
    }
}

template <class T, class R>
void Run(const T* v, int64_t base, int64_t xs, const R* h, int32_t taps, R scale, T* y, int64_t ys, int64_t count) {
    if (count <= 0) return;
    if (xs == 1)
        Lanes<T, R, 1>(v, base, 1, h, taps, scale, y, ys, count);
    else
        Lanes<T, R, 0>(v, base, xs, h, taps, scale, y, ys, count);
}

// The inputs as the filters see them: `past` older inputs, then x. Only the first outputs reach
// back into the past; they read a short copy of the past and the start of x, the others read x
// where it lies.
template <class T>
struct Signal {
    const T* head;  // past cells, then the first `past` inputs (or all of x if fewer)
    const T* x;
    int32_t past;
};

// y[o ys] = scale * sum_k h[k] v[past + i0 + o xs - k] for o in [0, count).
template <class T, class R>
void Direct(const Signal<T>& v, int64_t i0, int64_t xs, const R* h, int32_t taps, R scale, T* y, int64_t ys,
            int64_t count) {
    const int64_t early = std::clamp<int64_t>(CeilDiv(v.past - i0, xs), 0, std::max<int64_t>(count, 0));
    Run(v.head, v.past + i0, xs, h, taps, scale, y, ys, early);
    Run(v.x, i0 + early * xs, xs, h, taps, scale, y + early * ys, ys, count - early);
}

// Polyphase rows: row j holds h[j], h[j + F], h[j + 2F], ... (count[j] taps), rows K apart.
template <class R>
Status Polyphase(const R* h, int32_t taps, int32_t F, int32_t K, Scratch<R>* rows) {
    if (const Status s = rows->Allocate(static_cast<size_t>(F) * static_cast<size_t>(K))) return s;
    for (int32_t j = 0; j < F; ++j)
        for (int32_t k = 0, t = j; t < taps; ++k, t += F) (*rows)[static_cast<size_t>(j) * K + k] = h[t];
    return 0;
}

inline int32_t BranchTaps(int32_t taps, int32_t F, int32_t j) { return j < taps ? (taps - j + F - 1) / F : 0; }

// The past cells followed by the first min(n, past) inputs.
template <class T>
Status MakeHead(const T* state, int32_t past, const T* x, int32_t n, Scratch<T>* head) {
    const int32_t m = std::min(n, past);
    if (const Status s = head->Allocate(static_cast<size_t>(past) + static_cast<size_t>(m) + 1)) return s;
    std::copy(state, state + past, head->get());
    std::copy(x, x + m, head->get() + past);
    return 0;
}

// Interpolation: branch by branch, each a plain filter with its own taps over the inputs, its
// outputs L apart.
template <class T, class R>
Status Interpolate(const Signal<T>& v, int32_t n, const R* h, int32_t taps, int32_t L, R scale, int64_t d,
                   T* y) {
    const int32_t K = static_cast<int32_t>(CeilDiv(taps, L));
    Scratch<R> rows;
    if (const Status s = Polyphase(h, taps, L, K, &rows)) return s;
    for (int32_t j = 0; j < L; ++j) {
        const int64_t i0 = CeilDiv(d - j, L);
        Direct(v, i0, 1, rows.get() + static_cast<size_t>(j) * K, BranchTaps(taps, L, j), scale,
               y + (i0 * L + j - d), L, n - i0);
    }
    return rows.Release();
}

// Rational L / M: only the branches that fall on kept samples. The branch pattern repeats every
// P = lcm(L, M) / M outputs, the inputs then having moved on by lcm / L: each phase of the pattern
// is a plain filter over inputs lcm / L apart.
template <class T, class R>
Status Rational(const Signal<T>& v, int64_t count, const R* h, int32_t taps, int32_t L, int32_t M, R scale,
                int64_t t, T* y) {
    const int32_t K = static_cast<int32_t>(CeilDiv(taps, L));
    Scratch<R> rows;
    if (const Status s = Polyphase(h, taps, L, K, &rows)) return s;
    const int64_t lcm = int64_t{L} / std::gcd(L, M) * M;
    const int64_t period = lcm / M;
    for (int64_t o = 0; o < std::min(period, count); ++o, t += M) {
        const int64_t i = t / L;
        const int32_t j = static_cast<int32_t>(t - i * L);
        Direct(v, i, lcm / L, rows.get() + static_cast<size_t>(j) * K, BranchTaps(taps, L, j), scale, y + o, period,
               CeilDiv(count - o, period));
    }
    return rows.Release();
}

// y[o] = sum_k hr[k] q[o step + k] for o in [0, count), hr the taps reversed: several outputs side
// by side, inputs `step` apart.
template <class T, class R>
void Forward(const T* q, int64_t step, const R* hr, int32_t taps, T* y, int64_t count) {
    constexpr int B = sizeof(T) == 4 ? 8 : 4;
    int64_t o = 0;
    for (; o + B <= count; o += B) {
        T a[B] = {};
        const T* base = q + o * step;
        for (int32_t k = 0; k < taps; ++k) {
            const R hk = hr[k];
            const T* pk = base + k;
            for (int u = 0; u < B; ++u) a[u] += hk * pk[u * step];
        }
        for (int u = 0; u < B; ++u) y[o + u] = a[u];
    }
    for (; o < count; ++o) {
        T a{};
        const T* pk = q + o * step;
        for (int32_t k = 0; k < taps; ++k) a += hr[k] * pk[k];
        y[o] = a;
    }
}

// Decimation with the results of the transposed form: each output is its running accumulator,
// the contributions of the inputs added in their order, oldest first. Output m of the block
// (at input p + m M) starts from the carried accumulator when m < K, else from 0; the outputs
// whose inputs all lie in the block are formed directly, and the K accumulators of the outputs
// still to come are left in the state. Only the outputs that are kept are formed.
template <class T, class R>
Status Decimate(const T* x, int32_t n, const R* h, int32_t taps, int32_t M, T* state, int64_t* d, int32_t* counter,
                T* y) {
    const int32_t K = static_cast<int32_t>(CeilDiv(taps, M));
    const int64_t p = (M - *counter) % M;
    const int64_t events = CeilDiv(n - p, M);
    const int64_t dropped = std::min(*d, events);
    Scratch<R> reversed;
    Scratch<T> carried;
    if (const Status s = reversed.Allocate(static_cast<size_t>(taps))) return s;
    if (const Status s = carried.Allocate(static_cast<size_t>(K))) return s;
    std::reverse_copy(h, h + taps, reversed.get());
    std::copy(state, state + K, carried.get());
    // Accumulator of output m over the inputs of the block up to `end` (exclusive).
    auto partial = [&](int64_t m, int64_t end) {
        const int64_t at = p + m * M;
        T a = m < K ? carried[static_cast<size_t>(m)] : T{};
        for (int64_t i = std::max<int64_t>(0, at - taps + 1); i < end; ++i) a += x[i] * h[at - i];
        return a;
    };
    const int64_t carriedEnd = std::min<int64_t>(K, events);
    for (int64_t m = dropped; m < carriedEnd; ++m) y[m - dropped] = partial(m, p + m * M + 1);
    const int64_t m0 = std::max<int64_t>(K, dropped);
    if (m0 < events) Forward(x + (p + m0 * M - taps + 1), M, reversed.get(), taps, y + (m0 - dropped), events - m0);
    for (int32_t k = 0; k < K; ++k) state[k] = partial(events + k, n);
    *d -= dropped;
    *counter = static_cast<int32_t>((*counter + n) % M);
    return MergeRelease(reversed.Release(), carried.Release());
}

}  // namespace

int64_t MultiRateStateLength(int32_t mode, int32_t taps, int32_t L, int32_t M) {
    switch (mode) {
    case kPlain: return int64_t{taps} - 1;
    case kDecimate: return CeilDiv(taps, M) + 1;
    default: return CeilDiv(taps, L);
    }
}

int64_t MultiRateOutputs(int32_t mode, int32_t n, int32_t L, int32_t M, int32_t delay, int32_t counter) {
    const int64_t p = (M - counter) % M;
    int64_t chances = 0;
    switch (mode) {
    case kPlain: chances = n; break;
    case kInterpolate: chances = int64_t{n} * L; break;
    case kDecimate: chances = CeilDiv(n - p, M); break;
    default: chances = CeilDiv(int64_t{n} * L - p, M); break;
    }
    return std::max<int64_t>(0, chances - delay);
}

template <class T, class R>
Status MultiRateFir(int32_t mode, const T* x, int32_t n, const R* h, int32_t taps, int32_t L, int32_t M, R gain,
                    T* state, int32_t* delay, int32_t* counter, T* y) {
    int64_t d = *delay;
    if (mode == kDecimate) {
        const Status s = Decimate(x, n, h, taps, M, state, &d, counter, y);
        *delay = static_cast<int32_t>(d);
        return s;
    }
    const int32_t past = mode == kPlain ? taps - 1 : static_cast<int32_t>(CeilDiv(taps, L)) - 1;
    Scratch<T> head;
    if (const Status s = MakeHead(state, past, x, n, &head)) return s;
    const Signal<T> v{head.get(), x, past};
    Status s = 0;
    if (mode == kPlain) {
        if (d < n) Direct(v, d, 1, h, taps, gain, y, 1, n - d);
        d = std::max<int64_t>(0, d - n);
    } else if (mode == kInterpolate) {
        const int64_t total = int64_t{n} * L;
        if (d < total) s = Interpolate(v, n, h, taps, L, static_cast<R>(L) * gain, d, y);
        d = std::max<int64_t>(0, d - total);
    } else {
        const int64_t total = int64_t{n} * L;
        const int64_t first = (M - *counter) % M;
        const int64_t chances = CeilDiv(total - first, M);
        const int64_t t = first + std::min(d, chances) * M;
        if (t < total) s = Rational(v, chances - std::min(d, chances), h, taps, L, M, static_cast<R>(L) * gain, t, y);
        *counter = static_cast<int32_t>((*counter + total) % M);
        d = std::max<int64_t>(0, d - chances);
    }
    if (s == 0) {
        // The newest `past` inputs: from x, after what is left of the old past.
        const int32_t keep = std::max(past - n, 0);
        std::copy(state + (past - keep), state + past, state);
        std::copy(x + (n - (past - keep)), x + n, state + keep);
        if (mode != kPlain) state[past] = T{};
        *delay = static_cast<int32_t>(d);
    }
    return MergeRelease(s, head.Release());
}

Status StretchedFir(const double* x, int32_t n, const double* h, int32_t taps, int32_t L, double gain,
                    double* state, int32_t* delay, double* y) {
    const int64_t past = int64_t{taps - 1} * L;
    Scratch<double> v;
    if (const Status s = v.Allocate(static_cast<size_t>(past + n))) return s;
    std::copy(state, state + past, v.get());
    std::copy(x, x + n, v.get() + past);
    const double* w = v.get();
    const int32_t d = *delay;
    for (int64_t i = 0; i + d < n; ++i) {
        const double* q = w + past + i + d;
        double a = 0.0;
        for (int32_t k = 0; k < taps; ++k) a += h[k] * q[-int64_t{k} * L];
        y[i] = gain * a;
    }
    std::copy(w + n, w + n + past, state);
    *delay = d >= n ? d - n : 0;
    return v.Release();
}

template Status MultiRateFir<double, double>(int32_t, const double*, int32_t, const double*, int32_t, int32_t,
                                             int32_t, double, double*, int32_t*, int32_t*, double*);
template Status MultiRateFir<float, float>(int32_t, const float*, int32_t, const float*, int32_t, int32_t, int32_t,
                                           float, float*, int32_t*, int32_t*, float*);
template Status MultiRateFir<std::complex<double>, double>(int32_t, const std::complex<double>*, int32_t,
                                                           const double*, int32_t, int32_t, int32_t, double,
                                                           std::complex<double>*, int32_t*, int32_t*,
                                                           std::complex<double>*);
template Status MultiRateFir<std::complex<float>, float>(int32_t, const std::complex<float>*, int32_t, const float*,
                                                         int32_t, int32_t, int32_t, float, std::complex<float>*,
                                                         int32_t*, int32_t*, std::complex<float>*);

}  // namespace tw
