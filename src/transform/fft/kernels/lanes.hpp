// Lanes: how the kernel loops load and store values of several independent transforms at once.
// A lane type gives the value type V and the loads and stores at a lane stride (the distance, in
// f64, between the same element of neighbouring transforms). Each lane computes exactly what a
// scalar transform would: the same operations in the same order, no contraction.
//
// Load and Store take any lane stride; the Unit and Back forms serve lane strides 1 and -1, which
// the forms pick once per call, so that the straight-line code has no branch at its accesses.
//
// Pair loads and stores serve interleaved complex data (the imaginary part one f64 behind the real
// part): the two parts of a lane come in one access and are sorted into a real and an imaginary
// vector by shuffles.
//
// Everything here and in the kernel headers lives in the namespace TW_FFT_ISA: a source file
// compiled for a wider instruction set defines it before including them, so that none of its
// inline code can stand in for the baseline copy at link time.
#pragma once

#include <emmintrin.h>

#include <cstddef>
#include <cstdint>

#ifndef TW_FFT_ISA
#define TW_FFT_ISA sse2
#endif

namespace tw::fft::TW_FFT_ISA {

struct ScalarLanes {
    using V = double;
    static constexpr int kWidth = 1;
    using Narrower = void;
    static V Load(const double* p, ptrdiff_t) { return *p; }
    static void Store(double* p, ptrdiff_t, V v) { *p = v; }
    static V LoadUnit(const double* p) { return *p; }
    static V Broadcast(const double* p) { return *p; }
    static void StoreUnit(double* p, V v) { *p = v; }
    static V LoadBack(const double* p) { return *p; }
    static void StoreBack(double* p, V v) { *p = v; }
    static void LoadPair(const double* p, ptrdiff_t, V& re, V& im) {
        re = p[0];
        im = p[1];
    }
    // One 16-byte store, so that the pair loads of the next stage take it from the store buffer.
    static void StorePair(double* p, ptrdiff_t, V re, V im) { _mm_storeu_pd(p, _mm_set_pd(im, re)); }
};

// Vector values are the compiler's vector types, whose arithmetic is element by element, so that
// the straight-line kernels stay plain expressions (no wrapper objects for the optimiser to undo).
using Vec2 = __m128d;

struct Sse2Lanes {
    using V = Vec2;
    static constexpr int kWidth = 2;
    using Narrower = ScalarLanes;
    static V Load(const double* p, ptrdiff_t lane) { return _mm_set_pd(p[lane], p[0]); }
    static void Store(double* p, ptrdiff_t lane, V v) {
        _mm_storel_pd(p, v);
        _mm_storeh_pd(p + lane, v);
    }
    static V LoadUnit(const double* p) { return _mm_loadu_pd(p); }
    static V Broadcast(const double* p) { return _mm_load1_pd(p); }
    static void StoreUnit(double* p, V v) { _mm_storeu_pd(p, v); }
    // Lanes stepping backwards from p.
    static V LoadBack(const double* p) {
        const __m128d v = _mm_loadu_pd(p - 1);
        return _mm_shuffle_pd(v, v, 1);
    }
    static void StoreBack(double* p, V v) { _mm_storeu_pd(p - 1, _mm_shuffle_pd(v, v, 1)); }
    static void LoadPair(const double* p, ptrdiff_t lane, V& re, V& im) {
        const __m128d a = _mm_loadu_pd(p), b = _mm_loadu_pd(p + lane);
        re = _mm_unpacklo_pd(a, b);
        im = _mm_unpackhi_pd(a, b);
    }
    static void StorePair(double* p, ptrdiff_t lane, V re, V im) {
        _mm_storeu_pd(p, _mm_unpacklo_pd(re, im));
        _mm_storeu_pd(p + lane, _mm_unpackhi_pd(re, im));
    }
    // The stores of a block some of whose lanes repeat transforms done elsewhere: only the lanes
    // whose bits are set in `keep` are written.
    static void StoreKeep(double* p, ptrdiff_t lane, V v, int32_t keep) {
        if (keep & 1) _mm_storel_pd(p, v);
        if (keep & 2) _mm_storeh_pd(p + lane, v);
    }
    static void StorePairKeep(double* p, ptrdiff_t lane, V re, V im, int32_t keep) {
        if (keep & 1) _mm_storeu_pd(p, _mm_unpacklo_pd(re, im));
        if (keep & 2) _mm_storeu_pd(p + lane, _mm_unpackhi_pd(re, im));
    }
};

}  // namespace tw::fft::TW_FFT_ISA
