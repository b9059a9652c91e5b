#include "transform/zak.hpp"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <type_traits>

namespace tw {
namespace {

// x[i] += x[N + i] for the n - T samples from x[N] on, pass by pass of T samples. Ascending order
// within a pass, so each pass reads the values it began with.
template <class T>
void Fold(T* x, int64_t n, int64_t total, int64_t N) {
    const int64_t passes = n / total - 1;
    const T* src = x + N;
    for (int64_t pass = 0; pass < passes; ++pass, src += total)
        for (int64_t i = 0; i < total; ++i) x[i] += src[i];
    const int64_t rest = n % total;
    for (int64_t i = 0; i < rest; ++i) x[i] += src[i];
}

int64_t Mod(int64_t a, int64_t b) {
    const int64_t r = a % b;
    return r < 0 ? r + b : r;
}

}  // namespace

template <class T>
Status ZakTransform(const FftTable* table, T* x, int32_t n, int32_t M, int32_t N, int32_t offset,
                    cdouble* y, int32_t outLength) {
    constexpr bool kComplex = std::is_same_v<T, cdouble>;
    if (n < 1) return EmptyArrayErr;
    if (M < 1 || N < 1) return FftSizeErr;
    if (table == nullptr || table->size != N) return InternalErr;
    const int64_t total = int64_t{M} * N;
    if (n > total) Fold(x, n, total, N);
    std::fill(y, y + outLength, cdouble{});
    Scratch<double> work;
    if (const Status s = work.Allocate(static_cast<size_t>(N) * (kComplex ? 4 : 2))) return s;
    double* s = work.get();
    double* h = s + (kComplex ? 2 * N : N);
    const int64_t p = offset >= 0 ? offset % N : N - (-int64_t{offset}) % N;
    const double q0 = static_cast<double>(Mod(offset, total));
    Status status = 0;
    for (int32_t m = 0; m < M && status == 0; ++m) {
        for (int32_t j = 0; j < N; ++j) {
            const int64_t index = m + int64_t{j} * M;
            if (index < 0) return MergeRelease(DivisorLeadingZeroErr, work.Release());
            const T v = index < n ? x[index] : T{};
            if constexpr (kComplex) {
                s[j] = v.real();
                s[N + j] = v.imag();
            } else {
                s[j] = v;
            }
        }
        if constexpr (kComplex)
            status = FftComplexForward(table, s, s + N, h, h + N, 1, 1, N);
        else
            status = FftRealForward(table, s, h, 1, 1, N);
        if (status != 0) break;
        const double r = static_cast<double>(m) / static_cast<double>(total);
        const double twoPi = 2 * std::numbers::pi;
        cdouble phase = std::polar(1.0, -twoPi * r * q0);
        const cdouble step = std::polar(1.0, -twoPi * r);
        for (int32_t q = 0; q < outLength; ++q) {
            const auto u = static_cast<int32_t>((p + q) % N);
            cdouble H;
            if constexpr (kComplex) {
                H = {h[u], h[N + u]};
            } else if (u == 0 || 2 * int64_t{u} == N) {
                H = {h[u], 0.0};
            } else if (2 * int64_t{u} < N) {
                H = {h[u], h[N - u]};
            } else {
                H = {h[N - u], -h[u]};
            }
            y[q] += H * phase;
            phase *= step;
        }
    }
    return MergeRelease(status, work.Release());
}

template Status ZakTransform<double>(const FftTable*, double*, int32_t, int32_t, int32_t, int32_t, cdouble*,
                                     int32_t);
template Status ZakTransform<cdouble>(const FftTable*, cdouble*, int32_t, int32_t, int32_t, int32_t, cdouble*,
                                      int32_t);

}  // namespace tw
