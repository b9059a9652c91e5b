#include <emmintrin.h>

#include <algorithm>
#include <utility>

#include "transform/fft/fft.hpp"
#include "transform/fft/generic_dft.hpp"
#include "transform/fft/kernels/loops.hpp"

namespace tw {
namespace fft {

Status GenericDft::Complex(const double* xr, const double* xi, double* yr, double* yi) const {
    return kind == KindOdd ? OddComplex(stage, radix, xr, xi, yr, yi, work)
                           : RaderComplex(stage, radix, xr, xi, 1, 0, yr, yi, 1, 0, 1, work);
}

Status GenericDft::Real(const double* x, double* y) const {
    return kind == KindOdd ? OddReal(stage, radix, x, y, work) : RaderReal(stage, radix, x, 1, 0, y, 1, 0, 1, work);
}

Status OddComplex(const FftStage* st, int32_t p, const double* xr, const double* xi, double* yr,
                  double* yi, double* work) {
    const int32_t h = (p - 1) / 2;
    double *ar = work, *ai = ar + p, *br = ai + p, *bi = br + p;
    double sr = xr[0], si = xi[0];
    for (int32_t q = 1; q <= h; ++q) {
        ar[q] = xr[q] + xr[p - q];
        ai[q] = xi[q] + xi[p - q];
        br[q] = xr[q] - xr[p - q];
        bi[q] = xi[q] - xi[p - q];
        sr += ar[q];
        si += ai[q];
    }
    const double* c = st->oddCos;
    const double* s = st->oddSin;
    for (int32_t k = 1; k <= h; ++k) {
        double tr = xr[0], ti = xi[0], ur = 0, ui = 0;
        int32_t idx = k;
        for (int32_t q = 1; q <= h; ++q) {
            tr += ar[q] * c[idx];
            ti += ai[q] * c[idx];
            ur += br[q] * s[idx];
            ui += bi[q] * s[idx];
            idx += k;
            if (idx >= p) idx -= p;
        }
        // X[k] = T + i U and X[p-k] = T - i U, with U the sum over the (negative) sines.
        yr[k] = tr - ui;
        yi[k] = ti + ur;
        yr[p - k] = tr + ui;
        yi[p - k] = ti - ur;
    }
    yr[0] = sr;
    yi[0] = si;
    return 0;
}

Status OddReal(const FftStage* st, int32_t p, const double* x, double* y, double* work) {
    const int32_t h = (p - 1) / 2;
    double *a = work, *b = a + p;
    double sum = x[0];
    for (int32_t q = 1; q <= h; ++q) {
        a[q] = x[q] + x[p - q];
        b[q] = x[q] - x[p - q];
        sum += a[q];
    }
    for (int32_t k = 1; k <= h; ++k) {
        double re = x[0], im = 0;
        int32_t idx = k;
        for (int32_t q = 1; q <= h; ++q) {
            re += a[q] * st->oddCos[idx];
            im += b[q] * st->oddSin[idx];
            idx += k;
            if (idx >= p) idx -= p;
        }
        y[k] = re;
        y[p - k] = im;
    }
    y[0] = sum;
    return 0;
}

namespace {

struct RealPtr {
    double* p;
    RealPtr At(ptrdiff_t o) const { return {p + o}; }
};
struct ComplexPtr {
    double* re;
    double* im;
    ComplexPtr At(ptrdiff_t o) const { return {re + o, im + o}; }
};

// Runs f on a GenericDft of stage i with its scratch; the scratch status merges into f's.
template <class F>
Status WithGeneric(const FftTable* t, int32_t i, F f) {
    const int32_t p = t->factors[i];
    Scratch<double> scratch;
    if (const Status s = scratch.Allocate(GenericScratch(p))) return s;
    GenericDft d{p, t->kinds[i], t->stages[i], scratch.get(), scratch.get() + 4 * static_cast<ptrdiff_t>(p)};
    const Status s = f(d);
    return MergeRelease(s, scratch.Release());
}

// A Rader leaf runs its sub-transforms where they stand: sub-transform q reads at the stride
// count si from in + q si and writes p values at so from out + q p so. Neighbouring ones run in
// groups whose transforms of length p-1 share vector lanes (see ComplexForwardGroup); those of
// long ones run one by one, as their data fill the cache alone.
inline constexpr int32_t kRaderGroupLength = 1 << 12;

int32_t RaderGroup(int32_t p, int32_t count) {
    return p - 1 < kRaderGroupLength ? std::min(count, kRaderGroup) : 1;
}

// Rader's DFTs of a group of g members (see RaderComplex), on either kind of data.
Status RaderGroupDft(const FftStage* st, int32_t p, RealPtr x, ptrdiff_t xs, ptrdiff_t xl, RealPtr y, ptrdiff_t ys,
                     ptrdiff_t yl, int32_t g, double* work) {
    return RaderReal(st, p, x.p, xs, xl, y.p, ys, yl, g, work);
}

Status RaderGroupDft(const FftStage* st, int32_t p, ComplexPtr x, ptrdiff_t xs, ptrdiff_t xl, ComplexPtr y,
                     ptrdiff_t ys, ptrdiff_t yl, int32_t g, double* work) {
    return RaderComplex(st, p, x.re, x.im, xs, xl, y.re, y.im, ys, yl, g, work);
}

template <class D>
Status RaderLeaf(const FftTable* t, int32_t i, D in, D out, ptrdiff_t si, ptrdiff_t so, int32_t count) {
    const int32_t p = t->factors[i], group = RaderGroup(p, count);
    Scratch<double> scratch;
    if (const Status s = scratch.Allocate(4 * static_cast<size_t>(p) * static_cast<size_t>(group))) return s;
    Status s = 0;
    for (int32_t q = 0; q < count && s == 0; q += group) {
        const int32_t g = std::min(group, count - q);
        s = RaderGroupDft(t->stages[i], p, in.At(q * si), count * si, si, out.At(static_cast<ptrdiff_t>(q) * p * so),
                          so, static_cast<ptrdiff_t>(p) * so, g, scratch.get());
    }
    return MergeRelease(s, scratch.Release());
}

Status Leaf(const FftTable* t, int32_t i, RealPtr in, RealPtr out, ptrdiff_t si, ptrdiff_t so, int32_t count) {
    if (t->kinds[i] == KindCodelet) {
        t->leafReal[i](in.p, out.p, si, so, count);
        return 0;
    }
    if (t->kinds[i] == KindRader) return RaderLeaf(t, i, in, out, si, so, count);
    return WithGeneric(t, i, [&](GenericDft& d) {
        return sse2::RealLeafForm<sse2::ScalarLanes>(d, in.p, out.p, si, so, count);
    });
}

Status Leaf(const FftTable* t, int32_t i, ComplexPtr in, ComplexPtr out, ptrdiff_t si, ptrdiff_t so,
            int32_t count) {
    if (t->kinds[i] == KindCodelet) {
        t->leafComplex[i](in.re, in.im, out.re, out.im, si, so, count);
        return 0;
    }
    if (t->kinds[i] == KindRader) return RaderLeaf(t, i, in, out, si, so, count);
    return WithGeneric(t, i, [&](GenericDft& d) {
        return sse2::ComplexLeafForm<sse2::ScalarLanes>(d, in.re, in.im, out.re, out.im, si, so, count);
    });
}

Status Combine(const FftTable* t, int32_t i, RealPtr data, ptrdiff_t s, int32_t m) {
    const FftStage* st = t->stages[i];
    if (t->kinds[i] == KindCodelet) {
        t->combineReal[i](data.p, st->laneTwiddleRe, st->laneTwiddleIm, s, m);
        return 0;
    }
    return WithGeneric(t, i, [&](GenericDft& d) {
        return sse2::RealCombineForm<sse2::ScalarLanes>(d, data.p, st->laneTwiddleRe, st->laneTwiddleIm, s, m);
    });
}

Status Combine(const FftTable* t, int32_t i, ComplexPtr data, ptrdiff_t s, int32_t m) {
    const FftStage* st = t->stages[i];
    if (t->kinds[i] == KindCodelet) {
        t->combineComplex[i](data.re, data.im, st->laneTwiddleRe, st->laneTwiddleIm, s, m);
        return 0;
    }
    return WithGeneric(t, i, [&](GenericDft& d) {
        return sse2::ComplexCombineForm<sse2::ScalarLanes>(d, data.re, data.im, st->laneTwiddleRe, st->laneTwiddleIm, s, m);
    });
}

// Leaves side by side (see RealLeafLanesForm): leaf g reads from in + g il and writes to out + g ol.
Status LeafLanes(const FftTable* t, int32_t i, RealPtr in, RealPtr out, ptrdiff_t si, ptrdiff_t so,
                 int32_t count, int32_t group, ptrdiff_t il, ptrdiff_t ol) {
    if (t->kinds[i] == KindCodelet) {
        Codelets().leafRealLanes[t->factors[i]](in.p, out.p, si, so, count, group, il, ol);
        return 0;
    }
    for (int32_t g = 0; g < group; ++g)
        if (const Status s = Leaf(t, i, in.At(g * il), out.At(g * ol), si, so, count); s < 0) return s;
    return 0;
}

Status LeafLanes(const FftTable* t, int32_t i, ComplexPtr in, ComplexPtr out, ptrdiff_t si, ptrdiff_t so,
                 int32_t count, int32_t group, ptrdiff_t il, ptrdiff_t ol) {
    if (t->kinds[i] == KindCodelet) {
        const FftComplexLeafLanes leaf = Codelets().leafComplexLanes[t->factors[i]];
        leaf(in.re, in.im, out.re, out.im, si, so, count, group, il, ol);
        return 0;
    }
    for (int32_t g = 0; g < group; ++g)
        if (const Status s = Leaf(t, i, in.At(g * il), out.At(g * ol), si, so, count); s < 0) return s;
    return 0;
}

// Combines side by side (combine g at data + g lane). Short complex ones of a group that lies
// within the first-level cache share vector lanes across the group (see ComplexCombineLanesForm);
// the others run one by one, with lanes across their own columns.
inline constexpr int32_t kLaneCombineColumns = 32;
inline constexpr ptrdiff_t kLaneCombineSpan = 1 << 12;  // f64

bool SideBySide(const FftTable* t, int32_t i, int32_t m, int32_t group, ptrdiff_t lane) {
    return t->kinds[i] == KindCodelet && m <= kLaneCombineColumns && group * lane <= kLaneCombineSpan;
}

Status CombineLanes(const FftTable* t, int32_t i, RealPtr data, ptrdiff_t s, int32_t m, int32_t group,
                    ptrdiff_t lane) {
    if (SideBySide(t, i, m, group, lane)) {
        const FftStage* st = t->stages[i];
        Codelets().combineRealLanes[t->factors[i]](data.p, st->laneTwiddleRe, st->laneTwiddleIm, s, m, group, lane);
        return 0;
    }
    for (int32_t g = 0; g < group; ++g)
        if (const Status st = Combine(t, i, data.At(g * lane), s, m); st < 0) return st;
    return 0;
}

Status CombineLanes(const FftTable* t, int32_t i, ComplexPtr data, ptrdiff_t s, int32_t m, int32_t group,
                    ptrdiff_t lane) {
    if (SideBySide(t, i, m, group, lane)) {
        const FftStage* st = t->stages[i];
        Codelets().combineComplexLanes[t->factors[i]](data.re, data.im, st->laneTwiddleRe, st->laneTwiddleIm, s, m,
                                                      group, lane);
        return 0;
    }
    for (int32_t g = 0; g < group; ++g)
        if (const Status st = Combine(t, i, data.At(g * lane), s, m); st < 0) return st;
    return 0;
}

// Transforms of three levels or more run the sub-transforms of their first level of radix 4 or
// more (with two levels below it) in groups, in step: each leaf call serves the leaves of the whole
// group at once, and the combines run once per member, or side by side when short (CombineLanes).
// Members of a group start at neighbouring inputs, so their leaves share the cache lines that one
// leaf alone, reading one value per line at a stride of a power of two, would fetch again and
// again, and the short leaves and combines fill vector lanes that their own few transforms would
// leave partly empty. Each member does the work of its own recursion, only in another order among
// independent parts: the bits are those of the plain recursion.
inline constexpr int32_t kLaneGroup = 8;
inline constexpr int32_t kLaneGroupSize = 1 << 8;  // below, the groups no longer pay for themselves

template <class D>
Status RecurseLanes(const FftTable* t, int32_t level, int32_t length, D in, D out, ptrdiff_t si, ptrdiff_t so,
                    int32_t group, ptrdiff_t il, ptrdiff_t ol) {
    const int32_t r = t->factors[level], m = length / r;
    if (level == t->stageCount - 2) {
        if (const Status s = LeafLanes(t, level + 1, in, out, si, so, r, group, il, ol); s < 0) return s;
    } else {
        for (int32_t q = 0; q < r; ++q) {
            const ptrdiff_t o = static_cast<ptrdiff_t>(q) * m * so;
            const Status s = RecurseLanes(t, level + 1, m, in.At(q * si), out.At(o), r * si, so, group, il, ol);
            if (s < 0) return s;
        }
    }
    return CombineLanes(t, level, out, so, m, group, ol);
}

template <class D>
Status Recurse(const FftTable* t, int32_t level, int32_t length, D in, D out, ptrdiff_t si, ptrdiff_t so) {
    const int32_t r = t->factors[level], m = length / r;
    if (level == t->stageCount - 2) {
        if (const Status s = Leaf(t, level + 1, in, out, si, so, r); s < 0) return s;
    } else {
        for (int32_t q = 0; q < r; ++q) {
            const Status s = Recurse(t, level + 1, m, in.At(q * si),
                                     out.At(static_cast<ptrdiff_t>(q) * m * so), r * si, so);
            if (s < 0) return s;
        }
    }
    return Combine(t, level, out, so, m);
}

// The recursion down to the level whose sub-transforms run in groups; kept out
// of line, so that the plain recursion of the many short transforms stays as lean as it was.
template <class D>
__attribute__((noinline)) Status RecurseLong(const FftTable* t, int32_t level, int32_t length, D in, D out,
                                             ptrdiff_t si, ptrdiff_t so) {
    const int32_t r = t->factors[level], m = length / r;
    if (level + 3 > t->stageCount) return Recurse(t, level, length, in, out, si, so);
    const int32_t group = r < 4 ? 0 : r < kLaneGroup ? r : kLaneGroup;
    int32_t q = 0;
    for (; group > 0 && q + group <= r; q += group) {
        const ptrdiff_t o = static_cast<ptrdiff_t>(q) * m * so;
        const Status s = RecurseLanes(t, level + 1, m, in.At(q * si), out.At(o), r * si, so, group, si,
                                      static_cast<ptrdiff_t>(m) * so);
        if (s < 0) return s;
    }
    for (; q < r; ++q) {
        const ptrdiff_t o = static_cast<ptrdiff_t>(q) * m * so;
        const Status s = group > 0 ? Recurse(t, level + 1, m, in.At(q * si), out.At(o), r * si, so)
                                   : RecurseLong(t, level + 1, m, in.At(q * si), out.At(o), r * si, so);
        if (s < 0) return s;
    }
    return Combine(t, level, out, so, m);
}

template <class D>
Status Forward(const FftTable* t, D in, D out, ptrdiff_t si, ptrdiff_t so) {
    if (t->stageCount == 1) return Leaf(t, 0, in, out, si, so, 1);
    if (t->size >= kLaneGroupSize) return RecurseLong(t, 0, t->size, in, out, si, so);
    return Recurse(t, 0, t->size, in, out, si, so);
}

template <class D>
Status ForwardGroup(const FftTable* t, D in, D out, ptrdiff_t si, ptrdiff_t so, int32_t group, ptrdiff_t il,
                    ptrdiff_t ol) {
    if (group == 1) return Forward(t, in, out, si, so);
    if (t->stageCount == 1) return LeafLanes(t, 0, in, out, si, so, 1, group, il, ol);
    return RecurseLanes(t, 0, t->size, in, out, si, so, group, il, ol);
}

}  // namespace

Status ComplexForwardGroup(const FftTable* t, const double* inRe, const double* inIm, double* outRe,
                           double* outIm, ptrdiff_t is, ptrdiff_t os, int32_t group, ptrdiff_t il, ptrdiff_t ol) {
    return ForwardGroup(t, ComplexPtr{const_cast<double*>(inRe), const_cast<double*>(inIm)}, ComplexPtr{outRe, outIm},
                        is, os, group, il, ol);
}

Status RealForwardGroup(const FftTable* t, const double* in, double* out, ptrdiff_t is, ptrdiff_t os,
                        int32_t group, ptrdiff_t il, ptrdiff_t ol) {
    return ForwardGroup(t, RealPtr{const_cast<double*>(in)}, RealPtr{out}, is, os, group, il, ol);
}

}  // namespace fft

Status FftRealForward(const FftTable* t, const double* in, double* out, ptrdiff_t inStride,
                      ptrdiff_t outStride, int32_t n) {
    if (t == nullptr || t->size != n) return InternalErr;
    if (n == 1) {
        out[0] = in[0];
        return 0;
    }
    return fft::Forward(t, fft::RealPtr{const_cast<double*>(in)}, fft::RealPtr{out}, inStride, outStride);
}

Status FftComplexForward(const FftTable* t, const double* inRe, const double* inIm, double* outRe,
                         double* outIm, ptrdiff_t inStride, ptrdiff_t outStride, int32_t n) {
    // A deliberate difference from the real form, kept for callers that test for below 0.
    if (t == nullptr || t->size != n) return -1;
    if (n == 1) {
        outRe[0] = inRe[0];
        outIm[0] = inIm[0];
        return 0;
    }
    return fft::Forward(t, fft::ComplexPtr{const_cast<double*>(inRe), const_cast<double*>(inIm)},
                        fft::ComplexPtr{outRe, outIm}, inStride, outStride);
}

Status FftComplexInverse(const FftTable* t, const double* inRe, const double* inIm, double* outRe,
                         double* outIm, ptrdiff_t inStride, ptrdiff_t outStride, int32_t n) {
    const Status s = FftComplexForward(t, inRe, inIm, outRe, outIm, inStride, outStride, n);
    if (s != 0) return s;
    for (int32_t k = 1; k <= (n - 1) / 2; ++k) {
        std::swap(outRe[k * outStride], outRe[(n - k) * outStride]);
        std::swap(outIm[k * outStride], outIm[(n - k) * outStride]);
    }
    const double scale = 1.0 / n;
    for (int32_t k = 0; k < n; ++k) {
        outRe[k * outStride] *= scale;
        outIm[k * outStride] *= scale;
    }
    return 0;
}

namespace {

// (a, b) at k and n-k become (a - b, a + b): half-complex to Hartley order and back.
void HartleyPairs(double* x, ptrdiff_t stride, int32_t n) {
    for (int32_t k = 1; k <= (n - 1) / 2; ++k) {
        const double a = x[k * stride], b = x[(n - k) * stride];
        x[k * stride] = a - b;
        x[(n - k) * stride] = a + b;
    }
}

}  // namespace

Status FftRealInverse(const FftTable* t, double* in, double* out, ptrdiff_t inStride, ptrdiff_t outStride,
                      int32_t n) {
    if (t == nullptr || t->size != n) return InternalErr;
    const double scale = 1.0 / n;
    for (int32_t k = 0; k < n; ++k) in[k * inStride] *= scale;
    HartleyPairs(in, inStride, n);
    if (const Status s = FftRealForward(t, in, out, inStride, outStride, n)) return s;
    HartleyPairs(out, outStride, n);
    return 0;
}

void FftUnpackHalfComplex(const double* h, int32_t n, int32_t shift, std::complex<double>* out) {
    // Centred, X[k] goes to (k + n/2) mod n, so X[0] is at n/2 for both parities. The cells of one
    // side (X[k] at k, or its conjugate at n/2 - k when centred) lie in the lower half of out's
    // lanes and are written from h first; the other side is their mirror. h may thus be the upper
    // half of out's lanes: the first pass writes below it (but for h[0], read beforehand), the
    // second reads nothing of it. Only moves and sign flips: the values are h's bits.
    const int32_t half = (n - 1) / 2;
    const bool centred = shift != 0;
    const int32_t o = centred ? n / 2 : 0;
    const double h0 = h[0];
    const double nyquist = n % 2 == 0 ? h[n / 2] : 0.0;
    double* y = reinterpret_cast<double*>(out);
    const __m128d conj = _mm_set_pd(-0.0, 0.0);
    const __m128d first = centred ? conj : _mm_setzero_pd();
    // Cell of X[k] (or of its conjugate) on the first side, and of the mirror on the other.
    const auto near = [&](int32_t k) { return y + 2 * static_cast<ptrdiff_t>(centred ? o - k : k); };
    const auto far = [&](int32_t k) { return y + 2 * static_cast<ptrdiff_t>(centred ? o + k : n - k); };
    int32_t k = 1;
    for (; k + 1 <= half; k += 2) {
        const __m128d a = _mm_loadu_pd(h + k);          // h[k], h[k+1]
        const __m128d b = _mm_loadu_pd(h + n - k - 1);  // h[n-k-1], h[n-k]
        _mm_storeu_pd(near(k), _mm_xor_pd(_mm_shuffle_pd(a, b, 2), first));
        _mm_storeu_pd(near(k + 1), _mm_xor_pd(_mm_shuffle_pd(a, b, 1), first));
    }
    if (k <= half) _mm_storeu_pd(near(k), _mm_xor_pd(_mm_set_pd(h[n - k], h[k]), first));
    for (k = 1; k <= half; ++k) _mm_storeu_pd(far(k), _mm_xor_pd(_mm_loadu_pd(near(k)), conj));
    out[o] = {h0, 0.0};
    if (n % 2 == 0) out[centred ? 0 : n / 2] = {nyquist, 0.0};
}

void FftPackHalfComplex(const std::complex<double>* in, int32_t n, int32_t shift, double* out) {
    const int32_t base = shift != 0 ? n / 2 : 0;
    out[0] = in[base].real();
    for (int32_t k = 1; k <= (n - 1) / 2; ++k) {
        out[k] = in[base + k].real();
        out[n - k] = in[base + k].imag();
    }
    if (n % 2 == 0) out[n / 2] = in[shift != 0 ? 0 : n / 2].real();
}

}  // namespace tw
