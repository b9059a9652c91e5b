// Lanes: how the kernel loops load and store values of several independent transforms at once.
// A lane type gives the value type V and the loads and stores at a lane stride (the distance, in
// f64, between the same element of neighbouring transforms). Each lane computes exactly what a
// scalar transform would: the same operations in the same order, no contraction.
#pragma once

#include <emmintrin.h>

#include <cstddef>

namespace tw::fft {

struct ScalarLanes {
    using V = double;
    static constexpr int kWidth = 1;
    static V Load(const double* p, ptrdiff_t) { return *p; }
    static void Store(double* p, ptrdiff_t, V v) { *p = v; }
};

struct Vec2 {
    __m128d v;
    Vec2() = default;
    explicit Vec2(__m128d x) : v(x) {}
    explicit Vec2(double c) : v(_mm_set1_pd(c)) {}
};
inline Vec2 operator+(Vec2 a, Vec2 b) { return Vec2(_mm_add_pd(a.v, b.v)); }
inline Vec2 operator-(Vec2 a, Vec2 b) { return Vec2(_mm_sub_pd(a.v, b.v)); }
inline Vec2 operator*(Vec2 a, Vec2 b) { return Vec2(_mm_mul_pd(a.v, b.v)); }
inline Vec2 operator*(Vec2 a, double c) { return Vec2(_mm_mul_pd(a.v, _mm_set1_pd(c))); }
inline Vec2 operator-(Vec2 a) { return Vec2(_mm_xor_pd(a.v, _mm_set1_pd(-0.0))); }

struct Sse2Lanes {
    using V = Vec2;
    static constexpr int kWidth = 2;
    static V Load(const double* p, ptrdiff_t lane) {
        if (lane == 1) return Vec2(_mm_loadu_pd(p));
        if (lane == -1) return Vec2(_mm_shuffle_pd(_mm_loadu_pd(p - 1), _mm_loadu_pd(p - 1), 1));
        return Vec2(_mm_loadh_pd(_mm_load_sd(p), p + lane));
    }
    static void Store(double* p, ptrdiff_t lane, V v) {
        if (lane == 1) {
            _mm_storeu_pd(p, v.v);
        } else if (lane == -1) {
            _mm_storeu_pd(p - 1, _mm_shuffle_pd(v.v, v.v, 1));
        } else {
            _mm_storel_pd(p, v.v);
            _mm_storeh_pd(p + lane, v.v);
        }
    }
};

}  // namespace tw::fft
