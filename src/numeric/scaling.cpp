#include "numeric/scaling.hpp"

#include <emmintrin.h>

#include <cmath>
#include <limits>

namespace tw {

void RangeScale(double* x, int32_t n, double* offset, double* scale) {
    // max and min are exact, so the lane split cannot change them. _mm_max_pd(v, m) is
    // v > m ? v : m lane by lane, the comparison form that passes over a NaN element.
    constexpr double kInf = std::numeric_limits<double>::infinity();
    __m128d hi0 = _mm_set1_pd(-kInf), hi1 = hi0, lo0 = _mm_set1_pd(kInf), lo1 = lo0;
    int32_t i = 0;
    for (; i + 4 <= n; i += 4) {
        const __m128d a = _mm_loadu_pd(x + i), b = _mm_loadu_pd(x + i + 2);
        hi0 = _mm_max_pd(a, hi0);
        hi1 = _mm_max_pd(b, hi1);
        lo0 = _mm_min_pd(a, lo0);
        lo1 = _mm_min_pd(b, lo1);
    }
    double hi[4], lo[4];
    _mm_storeu_pd(hi, hi0);
    _mm_storeu_pd(hi + 2, hi1);
    _mm_storeu_pd(lo, lo0);
    _mm_storeu_pd(lo + 2, lo1);
    for (; i < n; ++i) {
        hi[0] = x[i] > hi[0] ? x[i] : hi[0];
        lo[0] = x[i] < lo[0] ? x[i] : lo[0];
    }
    for (int k = 1; k < 4; ++k) {
        hi[0] = hi[k] > hi[0] ? hi[k] : hi[0];
        lo[0] = lo[k] < lo[0] ? lo[k] : lo[0];
    }
    const double max = hi[0], min = lo[0];
    if (!(max >= min)) {  // nothing but NaN
        *offset = *scale = std::numeric_limits<double>::quiet_NaN();
        return;
    }
    const double half = (max - min) * 0.5;
    *offset = half + min;
    *scale = half;
    const double inverse = 1 / half;
    const double off = *offset;
    if (std::isfinite(inverse)) {
        for (int32_t j = 0; j < n; ++j) x[j] = (x[j] - off) * inverse;
    } else {
        *scale = 1;
        for (int32_t j = 0; j < n; ++j) x[j] = x[j] - off;
    }
}

void PeakScale(double* x, int32_t n, double* peak) {
    double p[4] = {0, 0, 0, 0};
    int32_t i = 0;
    for (; i + 4 <= n; i += 4)
        for (int k = 0; k < 4; ++k) p[k] = std::fabs(x[i + k]) > p[k] ? std::fabs(x[i + k]) : p[k];
    for (; i < n; ++i) p[0] = std::fabs(x[i]) > p[0] ? std::fabs(x[i]) : p[0];
    for (int k = 1; k < 4; ++k) p[0] = p[k] > p[0] ? p[k] : p[0];
    *peak = p[0];
    if (p[0] == 0) return;
    const double inverse = 1 / p[0];
    for (int32_t j = 0; j < n; ++j) x[j] = x[j] * inverse;
}

void LinearEvaluate(double* x, int32_t n, double multiplier, double offset) {
    for (int32_t i = 0; i < n; ++i) x[i] = x[i] * multiplier + offset;
}

void Normalise(double* x, int32_t n, double* deviation, double* mean) {
    // Plain running sums: the order of summation is part of the result.
    double sum = 0;
    for (int32_t i = 0; i < n; ++i) sum += x[i];
    const double m = sum / n;
    double squares = 0;
    for (int32_t i = 0; i < n; ++i) squares += (x[i] - m) * (x[i] - m);
    const double sd = std::sqrt(squares / n);
    const double inverse = 1 / sd;
    for (int32_t i = 0; i < n; ++i) x[i] = (x[i] - m) * inverse;
    *deviation = sd;
    *mean = m;
}

void RectToPolar(double* x, double* y, int32_t n) {
    for (int32_t i = 0; i < n; ++i) {
        const double re = x[i], im = y[i];
        // The origin has phase 0 whatever the signs of its zeros.
        if (re == 0 && im == 0) {
            x[i] = y[i] = 0;
        } else {
            x[i] = std::sqrt(re * re + im * im);
            y[i] = std::atan2(im, re);
        }
    }
}

void PolarToRect(double* magnitude, double* phase, int32_t n) {
    for (int32_t i = 0; i < n; ++i) {
        const double r = magnitude[i], t = phase[i];
        magnitude[i] = r * std::cos(t);
        phase[i] = r * std::sin(t);
    }
}

}  // namespace tw
