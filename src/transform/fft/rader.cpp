// Rader's algorithm for a prime stage p: the DFT at the indices other than 0 is a cyclic
// convolution of length p-1 in the order of the powers of a primitive root, carried out by two
// forward transforms on a shared table of length p-1.
#include <immintrin.h>

#include <type_traits>

#include "transform/fft/generic_dft.hpp"
#include "transform/fft/table_internal.hpp"

namespace tw::fft {
namespace {

int32_t SmallestPrimitiveRoot(int32_t p) {
    if (p <= 2) return 1;
    for (int32_t g = 2;; ++g) {
        int32_t power = g, order = 1;
        while (power != 1) {
            int64_t next = static_cast<int64_t>(power) * g;
            while (next >= p) next -= p;
            power = static_cast<int32_t>(next);
            ++order;
        }
        if (order == p - 1) return g;
    }
}

// Interleaved pairs are written with one 16-byte store: the transforms read them that way, and a
// wide load of two narrow stores still in flight would stall.
inline void PutPair(double* p, double re, double im) { _mm_storeu_pd(p, _mm_set_pd(im, re)); }

// The product of each transformed element (u, v) by the kernel (c, d), conjugated: a forward
// transform of the conjugate is the conjugate of the inverse, so the second pass needs no inverse
// kernel. The element is (c u - d v, -(d u) - c v); with the kernel laid out as (c, -c, d, d) it is
// (u, v) (c, -c) - (v, u) (d, d), whose second lane -(c v) - d u is the same sum of the same two
// products.
void ConjugateProductsSse2(double* x, const double* k, int32_t n, int32_t q) {
    for (; q < n; ++q) {
        const __m128d uv = _mm_loadu_pd(x + 2 * q);
        const __m128d vu = _mm_shuffle_pd(uv, uv, 1);
        const __m128d a = _mm_mul_pd(uv, _mm_loadu_pd(k + 4 * q));
        const __m128d b = _mm_mul_pd(vu, _mm_loadu_pd(k + 4 * q + 2));
        _mm_storeu_pd(x + 2 * q, _mm_sub_pd(a, b));
    }
}

// The same two elements at a time, lane for lane (no fused products).
__attribute__((target("avx2"))) void ConjugateProductsAvx2(double* x, const double* k, int32_t n) {
    int32_t q = 0;
    for (; q + 2 <= n; q += 2) {
        const __m256d uv = _mm256_loadu_pd(x + 2 * q);
        const __m256d vu = _mm256_permute_pd(uv, 5);
        // Kernel values q and q+1: (c, -c) of both, then (d, d) of both.
        const __m256d k0 = _mm256_loadu_pd(k + 4 * q), k1 = _mm256_loadu_pd(k + 4 * q + 4);
        const __m256d cc = _mm256_permute2f128_pd(k0, k1, 0x20), dd = _mm256_permute2f128_pd(k0, k1, 0x31);
        _mm256_storeu_pd(x + 2 * q, _mm256_sub_pd(_mm256_mul_pd(uv, cc), _mm256_mul_pd(vu, dd)));
    }
    ConjugateProductsSse2(x, k, n, q);
}

const bool kAvx2 = [] {
    __builtin_cpu_init();
    return __builtin_cpu_supports("avx2") != 0;
}();

inline void ConjugateProducts(double* x, const double* k, int32_t n) {
    if (kAvx2)
        ConjugateProductsAvx2(x, k, n);
    else
        ConjugateProductsSse2(x, k, n, 0);
}

// Output 0 of each member sums the inputs in gather order, as the gather goes; the members' sums
// are independent chains, so a group keeps several adders busy. Interleaved data move as pairs
// (the sum of pairs is the two sums).
template <int G>
void GatherPairs(const int32_t* gather, int32_t m, const double* x, ptrdiff_t xs, ptrdiff_t xl, double* a,
                 double* sums) {
    __m128d sum[G];
    for (int32_t g = 0; g < G; ++g) sum[g] = _mm_loadu_pd(x + g * xl);
    for (int32_t q = 0; q < m; ++q) {
        const ptrdiff_t o = gather[q + 1] * xs;
        for (int32_t g = 0; g < G; ++g) {
            const __m128d u = _mm_loadu_pd(x + g * xl + o);
            sum[g] = _mm_add_pd(sum[g], u);
            _mm_storeu_pd(a + 2 * (g * static_cast<ptrdiff_t>(m) + q), u);
        }
    }
    for (int32_t g = 0; g < G; ++g) _mm_storeu_pd(sums + 2 * g, sum[g]);
}

template <int G>
void GatherSplit(const int32_t* gather, int32_t m, const double* xr, const double* xi, ptrdiff_t xs,
                 ptrdiff_t xl, double* a, double* sums) {
    double sr[G], si[G];
    for (int32_t g = 0; g < G; ++g) {
        sr[g] = xr[g * xl];
        si[g] = xi[g * xl];
    }
    for (int32_t q = 0; q < m; ++q) {
        const ptrdiff_t o = gather[q + 1] * xs;
        for (int32_t g = 0; g < G; ++g) {
            const double ur = xr[g * xl + o], ui = xi[g * xl + o];
            sr[g] += ur;
            si[g] += ui;
            PutPair(a + 2 * (g * static_cast<ptrdiff_t>(m) + q), ur, ui);
        }
    }
    for (int32_t g = 0; g < G; ++g) {
        sums[2 * g] = sr[g];
        sums[2 * g + 1] = si[g];
    }
}

template <int G>
void GatherReal(const int32_t* gather, int32_t m, const double* x, ptrdiff_t xs, ptrdiff_t xl, double* t,
                ptrdiff_t tl, double* sums) {
    double sum[G];
    for (int32_t g = 0; g < G; ++g) sum[g] = x[g * xl];
    for (int32_t q = 0; q < m; ++q) {
        const ptrdiff_t o = gather[q + 1] * xs;
        for (int32_t g = 0; g < G; ++g) {
            const double u = x[g * xl + o];
            sum[g] += u;
            t[g * tl + q] = u;
        }
    }
    for (int32_t g = 0; g < G; ++g) sums[g] = sum[g];
}

// Calls f with the group's size (1 to kRaderGroup) as a compile-time constant.
template <class F>
void WithGroupSize(int32_t group, F f) {
    static_assert(kRaderGroup == 4);
    switch (group) {
        case 4: f(std::integral_constant<int, 4>{}); break;
        case 3: f(std::integral_constant<int, 3>{}); break;
        case 2: f(std::integral_constant<int, 2>{}); break;
        default: f(std::integral_constant<int, 1>{}); break;
    }
}

}  // namespace

bool SetupRaderStage(FftStage* st, int32_t p) {
    const int32_t m = p - 1;
    st->raderTable = CreateLocked(m);
    st->raderGather = static_cast<int32_t*>(PlainAlloc(static_cast<size_t>(p) * sizeof(int32_t)));
    st->raderScatter = static_cast<int32_t*>(PlainAlloc(static_cast<size_t>(p) * sizeof(int32_t)));
    st->raderKernelRe = static_cast<double*>(PlainAlloc(static_cast<size_t>(m) * sizeof(double)));
    st->raderKernelIm = static_cast<double*>(PlainAlloc(static_cast<size_t>(m) * sizeof(double)));
    st->raderKernelPairs = static_cast<double*>(PlainAlloc(4 * static_cast<size_t>(m) * sizeof(double)));
    if (st->raderTable == nullptr || st->raderGather == nullptr || st->raderScatter == nullptr ||
        st->raderKernelRe == nullptr || st->raderKernelIm == nullptr || st->raderKernelPairs == nullptr)
        return false;
    const int32_t g = SmallestPrimitiveRoot(p);
    st->raderGather[0] = 0;
    st->raderGather[1] = 1;
    st->raderScatter[0] = 0;
    st->raderScatter[1] = 1;
    int64_t x = g;
    for (int32_t k = 2; k <= p - 1; ++k) {
        st->raderGather[k] = static_cast<int32_t>(x);
        st->raderScatter[p + 1 - k] = static_cast<int32_t>(x);
        x = x * g % p;
    }
    Scratch<double> w;
    if (w.Allocate(4 * static_cast<size_t>(m)) != 0) return false;
    double *er = w.get(), *ei = er + m, *cr = ei + m, *ci = cr + m;
    ExpRun(static_cast<long double>(kTwoPi) / p, 1, p - 1, er, ei, 1);
    const double scale = 1.0 / m;
    for (int32_t q = 0; q < m; ++q) {
        const int32_t j = st->raderScatter[q + 1];
        cr[q] = scale * er[j - 1];
        ci[q] = scale * ei[j - 1];
    }
    Status s = FftComplexForward(st->raderTable, cr, ci, st->raderKernelRe, st->raderKernelIm, 1, 1, m);
    s = MergeRelease(s, w.Release());
    for (int32_t q = 0; q < m; ++q) {
        double* k = st->raderKernelPairs + 4 * static_cast<ptrdiff_t>(q);
        k[0] = st->raderKernelRe[q];
        k[1] = -st->raderKernelRe[q];
        k[2] = k[3] = st->raderKernelIm[q];
    }
    return s == 0;
}

void ReleaseRaderStage(FftStage* st) {
    DestroyLocked(st->raderTable);
    PlainFree(st->raderGather);
    PlainFree(st->raderScatter);
    PlainFree(st->raderKernelRe);
    PlainFree(st->raderKernelIm);
    PlainFree(st->raderKernelPairs);
}

// The convolutions run on interleaved scratch (member g's two vectors of 2 (p-1) f64 at work +
// 2 g (p-1) and behind the group's first vectors), so that the transforms of length p-1 take the
// kernels' pair loads; the arithmetic is that of split data. Input j of member g stands at
// x[g xl + j xs] and its output k goes to y[g yl + k ys]: a leaf reads and writes its
// sub-transforms where they are, with no column copies. The members' transforms run side by side
// (see ComplexForwardGroup); each member's arithmetic is that of one DFT alone. All inputs are
// read before the first output is written.
Status RaderComplex(const FftStage* st, int32_t p, const double* xr, const double* xi, ptrdiff_t xs,
                    ptrdiff_t xl, double* yr, double* yi, ptrdiff_t ys, ptrdiff_t yl, int32_t group,
                    double* work) {
    const int32_t m = p - 1;
    const ptrdiff_t ml = 2 * static_cast<ptrdiff_t>(m);
    const int32_t* scatter = st->raderScatter;
    double *a = work, *b = work + group * ml;
    double x0[2 * kRaderGroup], sums[2 * kRaderGroup];
    for (int32_t g = 0; g < group; ++g) {
        x0[2 * g] = xr[g * xl];
        x0[2 * g + 1] = xi[g * xl];
    }
    const bool pairs = xi == xr + 1 && yi == yr + 1;
    if (pairs)
        WithGroupSize(group, [&](auto g) { GatherPairs<g>(st->raderGather, m, xr, xs, xl, a, sums); });
    else
        WithGroupSize(group, [&](auto g) { GatherSplit<g>(st->raderGather, m, xr, xi, xs, xl, a, sums); });
    if (const Status s = ComplexForwardGroup(st->raderTable, a, a + 1, b, b + 1, 2, 2, group, ml, ml)) return s;
    for (int32_t g = 0; g < group; ++g) ConjugateProducts(b + g * ml, st->raderKernelPairs, m);
    if (const Status s = ComplexForwardGroup(st->raderTable, b, b + 1, a, a + 1, 2, 2, group, ml, ml)) return s;
    // (t_re + x0_re, x0_im - t_im) is x0 plus (t_re, -t_im).
    for (int32_t g = 0; g < group; ++g) {
        const double* t = a + g * ml;
        double *zr = yr + g * yl, *zi = yi + g * yl;
        if (pairs) {
            const __m128d x = _mm_loadu_pd(x0 + 2 * g), conj = _mm_set_pd(-0.0, 0.0);
            for (int32_t k = 1; k <= m; ++k)
                _mm_storeu_pd(zr + scatter[k] * ys, _mm_add_pd(x, _mm_xor_pd(_mm_loadu_pd(t + 2 * (k - 1)), conj)));
        } else {
            for (int32_t k = 1; k <= m; ++k) {
                const ptrdiff_t o = scatter[k] * ys;
                zr[o] = t[2 * (k - 1)] + x0[2 * g];
                zi[o] = x0[2 * g + 1] - t[2 * (k - 1) + 1];
            }
        }
        zr[0] = sums[2 * g];
        zi[0] = sums[2 * g + 1];
    }
    return 0;
}

Status RaderReal(const FftStage* st, int32_t p, const double* x, ptrdiff_t xs, ptrdiff_t xl, double* y,
                 ptrdiff_t ys, ptrdiff_t yl, int32_t group, double* work) {
    const int32_t m = p - 1;
    const ptrdiff_t ml = 2 * static_cast<ptrdiff_t>(m);
    const int32_t* scatter = st->raderScatter;
    // t (the gathered input, later the second transform) and e (the expanded spectrum), per member.
    double *t = work, *e = work + group * ml;
    double sums[kRaderGroup];
    WithGroupSize(group, [&](auto g) { GatherReal<g>(st->raderGather, m, x, xs, xl, t, ml, sums); });
    // The half-complex results go behind output 0, at the output's stride.
    if (const Status s = RealForwardGroup(st->raderTable, t, y + ys, 1, ys, group, ml, yl)) return s;
    for (int32_t g = 0; g < group; ++g) {
        // m = p - 1 is even: expand the half-complex result into the full spectrum.
        const double* h = y + g * yl + ys;
        double* eg = e + g * ml;
        PutPair(eg, h[0], 0);
        PutPair(eg + m, h[(m / 2) * ys], 0);
        for (int32_t k = 1; k < m / 2; ++k) {
            const double re = h[k * ys], im = h[(m - k) * ys];
            PutPair(eg + 2 * k, re, im);
            PutPair(eg + 2 * (m - k), re, -im);
        }
        ConjugateProducts(eg, st->raderKernelPairs, m);
    }
    if (const Status s = ComplexForwardGroup(st->raderTable, e, e + 1, t, t + 1, 2, 2, group, ml, ml)) return s;
    for (int32_t g = 0; g < group; ++g) {
        const double x0 = x[g * xl];
        const double* tg = t + g * ml;
        double* z = y + g * yl;
        for (int32_t k = 1; k <= m; ++k) {
            const int32_t j = scatter[k];
            if (j <= p / 2) {
                z[j * ys] = tg[2 * (k - 1)] + x0;
                z[(p - j) * ys] = -tg[2 * (k - 1) + 1];
            }
        }
        z[0] = sums[g];
    }
    return 0;
}

}  // namespace tw::fft
