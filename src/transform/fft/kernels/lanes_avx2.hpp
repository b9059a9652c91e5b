// Four lanes of AVX2 vectors, for the kernels compiled for that instruction set only (see lanes.hpp).
// No FMA: every product and sum rounds on its own, as in the scalar code.
#pragma once

#include <immintrin.h>

#include "transform/fft/kernels/codelets.hpp"
#include "transform/fft/kernels/lanes.hpp"

namespace tw::fft::TW_FFT_ISA {

using Vec4 = __m256d;

struct Avx2Lanes {
    using V = Vec4;
    static constexpr int kWidth = 4;
    // Remainders go to the baseline's two lanes and scalars (a copy of those here would double
    // the compile time for the few transforms they serve).
    using Narrower = BaselineRest;
    static V Load(const double* p, ptrdiff_t lane) { return _mm256_set_pd(p[3 * lane], p[2 * lane], p[lane], p[0]); }
    static void Store(double* p, ptrdiff_t lane, V v) {
        const __m128d lo = _mm256_castpd256_pd128(v), hi = _mm256_extractf128_pd(v, 1);
        _mm_storel_pd(p, lo);
        _mm_storeh_pd(p + lane, lo);
        _mm_storel_pd(p + 2 * lane, hi);
        _mm_storeh_pd(p + 3 * lane, hi);
    }
    static V LoadUnit(const double* p) { return _mm256_loadu_pd(p); }
    static V Broadcast(const double* p) { return _mm256_broadcast_sd(p); }
    static void StoreUnit(double* p, V v) { _mm256_storeu_pd(p, v); }
    static V LoadBack(const double* p) { return _mm256_permute4x64_pd(_mm256_loadu_pd(p - 3), 0x1B); }
    static void StoreBack(double* p, V v) { _mm256_storeu_pd(p - 3, _mm256_permute4x64_pd(v, 0x1B)); }
    // Lanes 0 and 2 share one vector, 1 and 3 the other, so that one unpack sorts them.
    static void LoadPair(const double* p, ptrdiff_t lane, V& re, V& im) {
        const __m256d a = _mm256_insertf128_pd(_mm256_castpd128_pd256(_mm_loadu_pd(p)), _mm_loadu_pd(p + 2 * lane), 1);
        const __m256d b =
            _mm256_insertf128_pd(_mm256_castpd128_pd256(_mm_loadu_pd(p + lane)), _mm_loadu_pd(p + 3 * lane), 1);
        re = _mm256_unpacklo_pd(a, b);
        im = _mm256_unpackhi_pd(a, b);
    }
    static void StorePair(double* p, ptrdiff_t lane, V re, V im) {
        const __m256d a = _mm256_unpacklo_pd(re, im), b = _mm256_unpackhi_pd(re, im);
        _mm_storeu_pd(p, _mm256_castpd256_pd128(a));
        _mm_storeu_pd(p + 2 * lane, _mm256_extractf128_pd(a, 1));
        _mm_storeu_pd(p + lane, _mm256_castpd256_pd128(b));
        _mm_storeu_pd(p + 3 * lane, _mm256_extractf128_pd(b, 1));
    }
    // Four neighbouring interleaved values (lane stride 2), whole, in the lane order 0, 2, 1, 3:
    // one unpack of the two loads sorts them into that order, and one unpack back restores the
    // interleaving. Values that go with these lanes (twiddles) load crossed into the same order.
    static constexpr bool kUnitPairs = true;
    static void LoadPairUnit(const double* p, V& re, V& im) {
        const __m256d a = _mm256_loadu_pd(p), b = _mm256_loadu_pd(p + 4);
        re = _mm256_unpacklo_pd(a, b);
        im = _mm256_unpackhi_pd(a, b);
    }
    static void StorePairUnit(double* p, V re, V im) {
        _mm256_storeu_pd(p, _mm256_unpacklo_pd(re, im));
        _mm256_storeu_pd(p + 4, _mm256_unpackhi_pd(re, im));
    }
    static V LoadUnitCrossed(const double* p) { return _mm256_permute4x64_pd(_mm256_loadu_pd(p), 0xD8); }
    // StorePair of lanes in that order: the first unpack holds the values for p and p + lane.
    static void StorePairCrossed(double* p, ptrdiff_t lane, V re, V im) {
        const __m256d a = _mm256_unpacklo_pd(re, im), b = _mm256_unpackhi_pd(re, im);
        _mm_storeu_pd(p, _mm256_castpd256_pd128(a));
        _mm_storeu_pd(p + lane, _mm256_extractf128_pd(a, 1));
        _mm_storeu_pd(p + 2 * lane, _mm256_castpd256_pd128(b));
        _mm_storeu_pd(p + 3 * lane, _mm256_extractf128_pd(b, 1));
    }
    // Loads whose lanes 1 to 3 stand at the offsets o[1..3] (o[0] is 0), for blocks that repeat a
    // transform in several lanes.
    static V LoadAt(const double* p, const ptrdiff_t* o) { return _mm256_set_pd(p[o[3]], p[o[2]], p[o[1]], p[0]); }
    static void LoadPairAt(const double* p, const ptrdiff_t* o, V& re, V& im) {
        const __m256d a = _mm256_insertf128_pd(_mm256_castpd128_pd256(_mm_loadu_pd(p)), _mm_loadu_pd(p + o[2]), 1);
        const __m256d b =
            _mm256_insertf128_pd(_mm256_castpd128_pd256(_mm_loadu_pd(p + o[1])), _mm_loadu_pd(p + o[3]), 1);
        re = _mm256_unpacklo_pd(a, b);
        im = _mm256_unpackhi_pd(a, b);
    }
    // Only the lanes whose bits are set in `keep` (see lanes.hpp).
    static void StoreKeep(double* p, ptrdiff_t lane, V v, int32_t keep) {
        const __m128d lo = _mm256_castpd256_pd128(v), hi = _mm256_extractf128_pd(v, 1);
        if (keep & 1) _mm_storel_pd(p, lo);
        if (keep & 2) _mm_storeh_pd(p + lane, lo);
        if (keep & 4) _mm_storel_pd(p + 2 * lane, hi);
        if (keep & 8) _mm_storeh_pd(p + 3 * lane, hi);
    }
    static void StorePairKeep(double* p, ptrdiff_t lane, V re, V im, int32_t keep) {
        const __m256d a = _mm256_unpacklo_pd(re, im), b = _mm256_unpackhi_pd(re, im);
        if (keep & 1) _mm_storeu_pd(p, _mm256_castpd256_pd128(a));
        if (keep & 2) _mm_storeu_pd(p + lane, _mm256_castpd256_pd128(b));
        if (keep & 4) _mm_storeu_pd(p + 2 * lane, _mm256_extractf128_pd(a, 1));
        if (keep & 8) _mm_storeu_pd(p + 3 * lane, _mm256_extractf128_pd(b, 1));
    }
};

}  // namespace tw::fft::TW_FFT_ISA
