// The four kernel forms as loops around one DFT of the stage's radix.
//
// A DFT policy P gives the radix and the two block DFTs (complex on split values, real to
// half-complex). Codelet policies have a compile-time radix and keep their columns in registers
// or on the stack; the odd and Rader policies have a run-time radix and hand in scratch columns.
// Lanes L decide how many independent transforms (leaf sub-transforms, combine columns) one pass
// computes at once.
#pragma once

#include <cstddef>
#include <cstdint>

#include "frame/memory.hpp"
#include "transform/fft/kernels/lanes.hpp"

namespace tw::fft {

// Column buffers: on the stack for a compile-time radix, else the policy's scratch (6 p f64).
template <class V, int R>
struct Columns {
    template <class P>
    explicit Columns(const P&) {}
    V xr[R], xi[R], yr[R], yi[R];
};
template <class V>
struct Columns<V, 0> {
    template <class P>
    explicit Columns(const P& p)
        : xr(p.columns), xi(xr + p.radix), yr(xi + p.radix), yi(yr + p.radix) {}
    V *xr, *xi, *yr, *yi;
};

template <class V>
inline void Twiddle(V& re, V& im, V c, V d) {
    const V a = re, b = im;
    re = a * c - b * d;
    im = a * d + b * c;
}

// Sub-transforms q0..q1-1 of a leaf: q reads in[(q + j count) inStride] and writes
// out[(q r + k) outStride].
template <class L, class P>
Status ComplexLeafLoop(P& p, const double* inRe, const double* inIm, double* outRe, double* outIm,
                       ptrdiff_t is, ptrdiff_t os, int32_t count, int32_t q0, int32_t q1) {
    using V = typename L::V;
    const int32_t r = p.radix;
    const ptrdiff_t step = static_cast<ptrdiff_t>(count) * is, ro = static_cast<ptrdiff_t>(r) * os;
    Columns<V, P::kRadix> c(p);
    for (int32_t q = q0; q + L::kWidth <= q1; q += L::kWidth) {
        const double* pr = inRe + q * is;
        const double* pi = inIm + q * is;
        for (int32_t j = 0; j < r; ++j) {
            c.xr[j] = L::Load(pr + j * step, is);
            c.xi[j] = L::Load(pi + j * step, is);
        }
        if (const Status s = p.Complex(c.xr, c.xi, c.yr, c.yi)) return s;
        double* qr = outRe + q * ro;
        double* qi = outIm + q * ro;
        for (int32_t k = 0; k < r; ++k) {
            L::Store(qr + k * os, ro, c.yr[k]);
            L::Store(qi + k * os, ro, c.yi[k]);
        }
    }
    return 0;
}

template <class L, class P>
Status RealLeafLoop(P& p, const double* in, double* out, ptrdiff_t is, ptrdiff_t os, int32_t count,
                    int32_t q0, int32_t q1) {
    using V = typename L::V;
    const int32_t r = p.radix;
    const ptrdiff_t step = static_cast<ptrdiff_t>(count) * is, ro = static_cast<ptrdiff_t>(r) * os;
    Columns<V, P::kRadix> c(p);
    for (int32_t q = q0; q + L::kWidth <= q1; q += L::kWidth) {
        const double* pq = in + q * is;
        for (int32_t j = 0; j < r; ++j) c.xr[j] = L::Load(pq + j * step, is);
        if (const Status s = p.Real(c.xr, c.yr)) return s;
        double* qo = out + q * ro;
        for (int32_t k = 0; k < r; ++k) L::Store(qo + k * os, ro, c.yr[k]);
    }
    return 0;
}

// Columns j0..j1-1 of a complex combine; column 0 has no twiddles, column j >= 1 takes the
// twiddles at (j-1)(r-1).
template <class L, class P>
Status ComplexCombineLoop(P& p, double* re, double* im, const double* twRe, const double* twIm,
                          ptrdiff_t s, int32_t m, int32_t j0, int32_t j1) {
    using V = typename L::V;
    const int32_t r = p.radix;
    const ptrdiff_t ms = static_cast<ptrdiff_t>(m) * s;
    Columns<V, P::kRadix> c(p);
    for (int32_t j = j0; j + L::kWidth <= j1; j += L::kWidth) {
        double* pr = re + j * s;
        double* pi = im + j * s;
        c.xr[0] = L::Load(pr, s);
        c.xi[0] = L::Load(pi, s);
        if (j == 0) {
            for (int32_t i = 1; i < r; ++i) {
                c.xr[i] = L::Load(pr + i * ms, s);
                c.xi[i] = L::Load(pi + i * ms, s);
            }
        } else {
            const double* wr = twRe + static_cast<ptrdiff_t>(j - 1) * (r - 1) - 1;
            const double* wi = twIm + static_cast<ptrdiff_t>(j - 1) * (r - 1) - 1;
            for (int32_t i = 1; i < r; ++i) {
                c.xr[i] = L::Load(pr + i * ms, s);
                c.xi[i] = L::Load(pi + i * ms, s);
                Twiddle(c.xr[i], c.xi[i], L::Load(wr + i, r - 1), L::Load(wi + i, r - 1));
            }
        }
        if (const Status st = p.Complex(c.xr, c.xi, c.yr, c.yi)) return st;
        for (int32_t i = 0; i < r; ++i) {
            L::Store(pr + i * ms, s, c.yr[i]);
            L::Store(pi + i * ms, s, c.yi[i]);
        }
    }
    return 0;
}

// Column pairs (k, m-k) for k0 <= k < k1 of a real combine. Lanes run over neighbouring k, so the
// mirrored column m-k steps backwards.
template <class L, class P>
Status RealCombinePairs(P& p, double* data, const double* twRe, const double* twIm, ptrdiff_t s,
                        int32_t m, int32_t k0, int32_t k1) {
    using V = typename L::V;
    const int32_t r = p.radix;
    const ptrdiff_t ms = static_cast<ptrdiff_t>(m) * s;
    Columns<V, P::kRadix> c(p);
    for (int32_t k = k0; k + L::kWidth <= k1; k += L::kWidth) {
        double* front = data + k * s;
        double* back = data + (m - k) * s;
        c.xr[0] = L::Load(front, s);
        c.xi[0] = L::Load(back, -s);
        const double* wr = twRe + static_cast<ptrdiff_t>(k - 1) * (r - 1) - 1;
        const double* wi = twIm + static_cast<ptrdiff_t>(k - 1) * (r - 1) - 1;
        for (int32_t i = 1; i < r; ++i) {
            c.xr[i] = L::Load(front + i * ms, s);
            c.xi[i] = L::Load(back + i * ms, -s);
            Twiddle(c.xr[i], c.xi[i], L::Load(wr + i, r - 1), L::Load(wi + i, r - 1));
        }
        if (const Status st = p.Complex(c.xr, c.xi, c.yr, c.yi)) return st;
        // Output q is X[k + q m]; below the middle it is stored as it is, above as the
        // conjugate of its mirror (r - q) m - k.
        for (int32_t q = 0; q < r; ++q) {
            double* a = front + q * ms;
            double* b = back + (r - 1 - q) * ms;
            if (2 * q < r) {
                L::Store(a, s, c.yr[q]);
                L::Store(b, -s, c.yi[q]);
            } else {
                L::Store(b, -s, c.yr[q]);
                L::Store(a, s, -c.yi[q]);
            }
        }
    }
    return 0;
}

// Column 0 (a real DFT without twiddles) and, for even m, the middle column m/2, whose real
// values times the twiddles exp(-i pi j / r) give the half-frequency outputs.
template <class P>
Status RealCombineEdges(P& p, double* data, const double* twRe, const double* twIm, ptrdiff_t s,
                        int32_t m) {
    const int32_t r = p.radix;
    const ptrdiff_t ms = static_cast<ptrdiff_t>(m) * s;
    Columns<double, P::kRadix> c(p);
    for (int32_t i = 0; i < r; ++i) c.xr[i] = data[i * ms];
    if (const Status st = p.Real(c.xr, c.yr)) return st;
    for (int32_t i = 0; i < r; ++i) data[i * ms] = c.yr[i];
    if (m % 2 != 0) return 0;
    double* mid = data + (m / 2) * s;
    const double* wr = twRe + static_cast<ptrdiff_t>(m / 2 - 1) * (r - 1) - 1;
    const double* wi = twIm + static_cast<ptrdiff_t>(m / 2 - 1) * (r - 1) - 1;
    c.xr[0] = mid[0];
    c.xi[0] = 0.0;
    for (int32_t i = 1; i < r; ++i) {
        const double v = mid[i * ms];
        c.xr[i] = v * wr[i];
        c.xi[i] = v * wi[i];
    }
    if (const Status st = p.Complex(c.xr, c.xi, c.yr, c.yi)) return st;
    for (int32_t q = 0; 2 * q + 1 <= r; ++q) {
        mid[q * ms] = c.yr[q];
        if (2 * q + 1 < r) mid[(r - 1 - q) * ms] = c.yi[q];
    }
    return 0;
}

// Whole forms: the vector lanes over as many transforms as fill them, scalar for the rest.
template <class L, class P>
Status ComplexLeafForm(P& p, const double* inRe, const double* inIm, double* outRe, double* outIm,
                       ptrdiff_t is, ptrdiff_t os, int32_t count) {
    const int32_t v = count - count % L::kWidth;
    if (const Status s = ComplexLeafLoop<L>(p, inRe, inIm, outRe, outIm, is, os, count, 0, v)) return s;
    return ComplexLeafLoop<ScalarLanes>(p, inRe, inIm, outRe, outIm, is, os, count, v, count);
}

template <class L, class P>
Status RealLeafForm(P& p, const double* in, double* out, ptrdiff_t is, ptrdiff_t os, int32_t count) {
    const int32_t v = count - count % L::kWidth;
    if (const Status s = RealLeafLoop<L>(p, in, out, is, os, count, 0, v)) return s;
    return RealLeafLoop<ScalarLanes>(p, in, out, is, os, count, v, count);
}

template <class L, class P>
Status ComplexCombineForm(P& p, double* re, double* im, const double* twRe, const double* twIm,
                          ptrdiff_t s, int32_t m) {
    const int32_t v = 1 + (m - 1) / L::kWidth * L::kWidth;
    if (const Status st = ComplexCombineLoop<ScalarLanes>(p, re, im, twRe, twIm, s, m, 0, 1)) return st;
    if (const Status st = ComplexCombineLoop<L>(p, re, im, twRe, twIm, s, m, 1, v)) return st;
    return ComplexCombineLoop<ScalarLanes>(p, re, im, twRe, twIm, s, m, v, m);
}

template <class L, class P>
Status RealCombineForm(P& p, double* data, const double* twRe, const double* twIm, ptrdiff_t s,
                       int32_t m) {
    const int32_t pairs = (m - 1) / 2;
    const int32_t v = 1 + pairs / L::kWidth * L::kWidth;
    if (const Status st = RealCombineEdges(p, data, twRe, twIm, s, m)) return st;
    if (const Status st = RealCombinePairs<L>(p, data, twRe, twIm, s, m, 1, v)) return st;
    return RealCombinePairs<ScalarLanes>(p, data, twRe, twIm, s, m, v, pairs + 1);
}

}  // namespace tw::fft
