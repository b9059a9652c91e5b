// Rader's algorithm for a prime stage p: the DFT at the indices other than 0 is a cyclic
// convolution of length p-1 in the order of the powers of a primitive root, carried out by two
// forward transforms on a shared table of length p-1.
#include <immintrin.h>

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

// The convolutions run on interleaved scratch (work holds 4 p f64), so that the transforms of
// length p-1 take the kernels' pair loads; the arithmetic is that of split data. Input j stands at
// x[j xs] and output k goes to y[k ys]: a leaf reads and writes its sub-transforms where they are,
// with no column copies. All inputs are read before the first output is written.
Status RaderComplex(const FftStage* st, int32_t p, const double* xr, const double* xi, ptrdiff_t xs,
                    double* yr, double* yi, ptrdiff_t ys, double* work) {
    const int32_t m = p - 1;
    const int32_t* gather = st->raderGather;
    const int32_t* scatter = st->raderScatter;
    double *a = work, *b = work + 2 * static_cast<ptrdiff_t>(m);
    const double x0r = xr[0], x0i = xi[0];
    // Output 0 sums the inputs in gather order, as the gather goes. Interleaved data move as pairs:
    // the sum of pairs is the two sums, and (t_re + x0_re, x0_im - t_im) is x0 plus (t_re, -t_im).
    const bool pairs = xi == xr + 1 && yi == yr + 1;
    double sr = x0r, si = x0i;
    if (pairs) {
        __m128d sum = _mm_loadu_pd(xr);
        for (int32_t q = 0; q < m; ++q) {
            const __m128d u = _mm_loadu_pd(xr + gather[q + 1] * xs);
            sum = _mm_add_pd(sum, u);
            _mm_storeu_pd(a + 2 * q, u);
        }
        sr = _mm_cvtsd_f64(sum);
        si = _mm_cvtsd_f64(_mm_unpackhi_pd(sum, sum));
    } else {
        for (int32_t q = 0; q < m; ++q) {
            const ptrdiff_t g = gather[q + 1] * xs;
            const double ur = xr[g], ui = xi[g];
            sr += ur;
            si += ui;
            PutPair(a + 2 * q, ur, ui);
        }
    }
    if (const Status s = FftComplexForward(st->raderTable, a, a + 1, b, b + 1, 2, 2, m)) return s;
    ConjugateProducts(b, st->raderKernelPairs, m);
    if (const Status s = FftComplexForward(st->raderTable, b, b + 1, a, a + 1, 2, 2, m)) return s;
    if (pairs) {
        const __m128d x0 = _mm_set_pd(x0i, x0r), conj = _mm_set_pd(-0.0, 0.0);
        for (int32_t k = 1; k <= m; ++k)
            _mm_storeu_pd(yr + scatter[k] * ys, _mm_add_pd(x0, _mm_xor_pd(_mm_loadu_pd(a + 2 * (k - 1)), conj)));
    } else {
        for (int32_t k = 1; k <= m; ++k) {
            const ptrdiff_t o = scatter[k] * ys;
            yr[o] = a[2 * (k - 1)] + x0r;
            yi[o] = x0i - a[2 * (k - 1) + 1];
        }
    }
    yr[0] = sr;
    yi[0] = si;
    return 0;
}

Status RaderReal(const FftStage* st, int32_t p, const double* x, ptrdiff_t xs, double* y, ptrdiff_t ys,
                 double* work) {
    const int32_t m = p - 1;
    const int32_t* gather = st->raderGather;
    const int32_t* scatter = st->raderScatter;
    // t (the gathered input, later the second transform) and e (the expanded spectrum).
    double *t = work, *e = work + 2 * static_cast<ptrdiff_t>(m);
    const double x0 = x[0];
    double sum = x0;
    for (int32_t q = 0; q < m; ++q) {
        t[q] = x[gather[q + 1] * xs];
        sum += t[q];
    }
    // The half-complex result goes behind output 0, at the output's stride.
    double* h = y + ys;
    if (const Status s = FftRealForward(st->raderTable, t, h, 1, ys, m)) return s;
    // m = p - 1 is even: expand the half-complex result into the full spectrum.
    PutPair(e, h[0], 0);
    PutPair(e + m, h[(m / 2) * ys], 0);
    for (int32_t k = 1; k < m / 2; ++k) {
        const double re = h[k * ys], im = h[(m - k) * ys];
        PutPair(e + 2 * k, re, im);
        PutPair(e + 2 * (m - k), re, -im);
    }
    ConjugateProducts(e, st->raderKernelPairs, m);
    if (const Status s = FftComplexForward(st->raderTable, e, e + 1, t, t + 1, 2, 2, m)) return s;
    for (int32_t k = 1; k <= m; ++k) {
        const int32_t j = scatter[k];
        if (j <= p / 2) {
            y[j * ys] = t[2 * (k - 1)] + x0;
            y[(p - j) * ys] = -t[2 * (k - 1) + 1];
        }
    }
    y[0] = sum;
    return 0;
}

}  // namespace tw::fft
