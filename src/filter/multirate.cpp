#include "filter/multirate.hpp"

#include <algorithm>
#include <complex>

namespace tw {

namespace {

int64_t CeilDiv(int64_t a, int64_t b) { return a <= 0 ? 0 : (a + b - 1) / b; }

// y[o] = scale * sum_k h[k] v[base + o - k] for o in [0, count): four outputs at a time, each
// summed in order of k, so that the compiler can run the four in one vector.
template <class T, class R>
void Direct(const T* v, int64_t base, const R* h, int32_t taps, R scale, T* y, int64_t count) {
    int64_t o = 0;
    for (; o + 4 <= count; o += 4) {
        T a0{}, a1{}, a2{}, a3{};
        const T* q = v + base + o;
        for (int32_t k = 0; k < taps; ++k) {
            const R hk = h[k];
            const T* p = q - k;
            a0 += hk * p[0];
            a1 += hk * p[1];
            a2 += hk * p[2];
            a3 += hk * p[3];
        }
        y[o] = scale * a0;
        y[o + 1] = scale * a1;
        y[o + 2] = scale * a2;
        y[o + 3] = scale * a3;
    }
    for (; o < count; ++o) {
        T a{};
        const T* q = v + base + o;
        for (int32_t k = 0; k < taps; ++k) a += h[k] * q[-k];
        y[o] = scale * a;
    }
}

// Polyphase branch j of input i (v holds `past` older inputs before x).
template <class T, class R>
T Branch(const T* v, int64_t at, const R* h, int32_t taps, int32_t L, int32_t j) {
    T a{};
    for (int32_t k = 0, t = j; t < taps; ++k, t += L) a += h[t] * v[at - k];
    return a;
}

// v = state (past cells) followed by x.
template <class T>
Status Extend(const T* state, int32_t past, const T* x, int32_t n, Scratch<T>* v) {
    if (const Status s = v->Allocate(static_cast<size_t>(past) + static_cast<size_t>(n))) return s;
    std::copy(state, state + past, v->get());
    std::copy(x, x + n, v->get() + past);
    return 0;
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
        // Transposed form: each input adds into the accumulators of the outputs it feeds; the
        // oldest one is complete when the counter comes round to 0.
        const int32_t K = static_cast<int32_t>(CeilDiv(taps, M));
        T* acc = state;
        int32_t c = *counter;
        int64_t o = 0;
        for (int32_t i = 0; i < n; ++i) {
            const T xi = x[i];
            for (int32_t k = 0, j = (M - c) % M; k < K && j < taps; ++k, j += M) acc[k] += xi * h[j];
            if (c == 0) {
                if (d > 0)
                    --d;
                else
                    y[o++] = acc[0];
                std::copy(acc + 1, acc + K, acc);
                acc[K - 1] = T{};
            }
            c = c + 1 == M ? 0 : c + 1;
        }
        *counter = c;
        *delay = static_cast<int32_t>(d);
        return 0;
    }
    const int32_t past = mode == kPlain ? taps - 1 : static_cast<int32_t>(CeilDiv(taps, L)) - 1;
    Scratch<T> v;
    if (const Status s = Extend(state, past, x, n, &v)) return s;
    const T* w = v.get();
    if (mode == kPlain) {
        if (d < n) Direct(w, past + d, h, taps, gain, y, n - d);
        d = std::max<int64_t>(0, d - n);
    } else if (mode == kInterpolate) {
        const R scale = static_cast<R>(L) * gain;
        const int64_t total = int64_t{n} * L;
        for (int64_t t = d, o = 0; t < total; ++t, ++o) {
            const int64_t i = t / L;
            y[o] = scale * Branch(w, past + i, h, taps, L, static_cast<int32_t>(t - i * L));
        }
        d = std::max<int64_t>(0, d - total);
    } else {
        // Only the branches that fall on a kept sample are evaluated.
        const R scale = static_cast<R>(L) * gain;
        const int64_t total = int64_t{n} * L;
        int64_t t = (M - *counter) % M;
        const int64_t chances = CeilDiv(total - t, M);
        t += std::min(d, chances) * M;
        for (int64_t o = 0; t < total; t += M, ++o) {
            const int64_t i = t / L;
            y[o] = scale * Branch(w, past + i, h, taps, L, static_cast<int32_t>(t - i * L));
        }
        *counter = static_cast<int32_t>((*counter + total) % M);
        d = std::max<int64_t>(0, d - chances);
    }
    std::copy(w + n, w + n + past, state);
    if (mode != kPlain) std::fill(state + past, state + past + 1, T{});
    *delay = static_cast<int32_t>(d);
    return v.Release();
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
