// The four kernel forms as loops around one DFT of the stage's radix.
//
// A DFT policy P gives the radix and the block DFTs (complex, and real to half-complex). Codelet
// policies have a compile-time radix and run straight-line code that loads each input through an
// accessor at its first use and stores each output through another; the odd and Rader policies
// have a run-time radix and work on scratch columns. Lanes L decide how many independent transforms
// (leaf sub-transforms, combine columns) one pass computes at once; what does not fill the widest
// lanes goes to the narrower ones (L::Narrower) and at last to scalars.
#pragma once

#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "frame/memory.hpp"
#include "transform/fft/kernels/codelets.hpp"
#include "transform/fft/kernels/lanes.hpp"

namespace tw::fft::TW_FFT_ISA {

#define TW_FFT_INLINE inline __attribute__((always_inline))

// The value, hidden from the optimiser: a loop that launders its strides at each block computes
// the block's addresses afresh from them, where it would otherwise keep one induction pointer per
// load and store of the block, far more than there are registers, and step them on the stack.
template <class P, class T>
TW_FFT_INLINE T Opaque(T x) {
    if constexpr (!P::kOutlined) asm("" : "+r"(x));
    return x;
}

template <class V>
TW_FFT_INLINE void Twiddle(V& re, V& im, V c, V d) {
    const V a = re, b = im;
    re = a * c - b * d;
    im = a * d + b * c;
}

// Complex values at re/im, element j at j step; lanes at `lane`. Pair: im is re + 1.
template <class L, bool Pair>
struct ComplexIn {
    using V = typename L::V;
    const double* re;
    const double* im;
    ptrdiff_t step, lane;
    TW_FFT_INLINE void C(int32_t j, V& r, V& i) const {
        if constexpr (Pair) {
            L::LoadPair(re + j * step, lane, r, i);
        } else {
            r = L::Load(re + j * step, lane);
            i = L::Load(im + j * step, lane);
        }
    }
};

// Masked: only the lanes whose bits are set in `keep` are stored; the others repeat transforms
// done elsewhere (the partial block of a loop, and short leaves).
// A short leaf's input: lane i reads the sub-transform at offset o[i] (see ShortLeafLanes).
template <class L, bool Pair>
struct OffsetComplexIn {
    using V = typename L::V;
    const double* re;
    const double* im;
    ptrdiff_t step;
    const ptrdiff_t* o;
    TW_FFT_INLINE void C(int32_t j, V& r, V& i) const {
        if constexpr (Pair) {
            L::LoadPairAt(re + j * step, o, r, i);
        } else {
            r = L::LoadAt(re + j * step, o);
            i = L::LoadAt(im + j * step, o);
        }
    }
};

template <class L>
struct OffsetRealIn {
    using V = typename L::V;
    const double* p;
    ptrdiff_t step;
    const ptrdiff_t* o;
    TW_FFT_INLINE void R(int32_t j, V& x) const { x = L::LoadAt(p + j * step, o); }
};

template <class L, bool Pair, bool Masked = false>
struct ComplexOut {
    using V = typename L::V;
    double* re;
    double* im;
    ptrdiff_t step, lane;
    int32_t keep;
    TW_FFT_INLINE void C(int32_t k, V r, V i) const {
        if constexpr (Masked && Pair) {
            L::StorePairKeep(re + k * step, lane, r, i, keep);
        } else if constexpr (Masked) {
            L::StoreKeep(re + k * step, lane, r, keep);
            L::StoreKeep(im + k * step, lane, i, keep);
        } else if constexpr (Pair) {
            L::StorePair(re + k * step, lane, r, i);
        } else {
            L::Store(re + k * step, lane, r);
            L::Store(im + k * step, lane, i);
        }
    }
};

// The twiddles of the combines come in the lane order of FftStage::laneTwiddleRe/Im: the one at
// element j of column c stands at (j-1)(m-1) + (c-1), so neighbouring columns load as one vector.
// Offset, within those arrays, of column c's "element 0" (one row before its first twiddle).
inline ptrdiff_t ColumnTwiddles(int32_t c, int32_t m) {
    return static_cast<ptrdiff_t>(c - 1) - static_cast<ptrdiff_t>(m - 1);
}

// How a block's lanes take their twiddles: Columns, the lanes are neighbouring columns; Crossed,
// the same in the lane order of the unit pair loads below; Shared, the lanes run across transforms
// at the same column, which all take that column's twiddle (see ComplexCombineLanesForm).
enum class TwiddleLanes { Columns, Crossed, Shared };

// An input whose element j >= 1 is multiplied by the twiddle at j of its column; w is the
// column's ColumnTwiddles offset, rows of twiddles stand wstep apart.
template <class L, class In, TwiddleLanes T = TwiddleLanes::Columns>
struct TwiddledIn {
    using V = typename L::V;
    In data;
    const double* wr;
    const double* wi;
    ptrdiff_t wstep;
    static TW_FFT_INLINE V Load(const double* w) {
        if constexpr (T == TwiddleLanes::Crossed)
            return L::LoadUnitCrossed(w);
        else if constexpr (T == TwiddleLanes::Shared)
            return L::Broadcast(w);
        else
            return L::LoadUnit(w);
    }
    TW_FFT_INLINE void C(int32_t j, V& r, V& i) const {
        data.C(j, r, i);
        if (j > 0) Twiddle(r, i, Load(wr + j * wstep), Load(wi + j * wstep));
    }
};

// Interleaved data whose lanes are neighbouring complex values, for lanes that load those whole
// (kUnitPairs; see Avx2Lanes::LoadPairUnit). Element j of the lanes starts at p + j step.
template <class L>
constexpr bool kUnitPairs = requires { L::kUnitPairs; };

template <class L>
struct UnitPairIn {
    using V = typename L::V;
    const double* p;
    ptrdiff_t step;
    TW_FFT_INLINE void C(int32_t j, V& r, V& i) const { L::LoadPairUnit(p + j * step, r, i); }
};

// Interleaved outputs of lanes in that order, lane by lane at `lane` apart.
template <class L>
struct CrossedPairOut {
    using V = typename L::V;
    double* p;
    ptrdiff_t step, lane;
    TW_FFT_INLINE void C(int32_t k, V r, V i) const { L::StorePairCrossed(p + k * step, lane, r, i); }
};

template <class L>
struct UnitPairOut {
    using V = typename L::V;
    double* p;
    ptrdiff_t step;
    TW_FFT_INLINE void C(int32_t k, V r, V i) const { L::StorePairUnit(p + k * step, r, i); }
};

// Real values at p, element j at j step; lanes at `lane`, which is 1 when Unit.
template <class L, bool Unit>
struct RealIn {
    using V = typename L::V;
    const double* p;
    ptrdiff_t step, lane;
    TW_FFT_INLINE void R(int32_t j, V& x) const {
        if constexpr (Unit)
            x = L::LoadUnit(p + j * step);
        else
            x = L::Load(p + j * step, lane);
    }
};

template <class L, bool Masked = false>
struct RealOut {
    using V = typename L::V;
    double* p;
    ptrdiff_t step, lane;
    int32_t keep;
    TW_FFT_INLINE void R(int32_t k, V y) const {
        if constexpr (Masked)
            L::StoreKeep(p + k * step, lane, y, keep);
        else
            L::Store(p + k * step, lane, y);
    }
};

// The column pair (k, m-k) of a real combine as one complex column; lanes run over neighbouring
// k, so the mirrored column steps backwards. Unit: the stride s is 1.
template <class L, bool Unit>
struct PairColumnIn {
    using V = typename L::V;
    const double* front;
    const double* back;
    ptrdiff_t ms, s;
    TW_FFT_INLINE void C(int32_t j, V& r, V& i) const {
        if constexpr (Unit) {
            r = L::LoadUnit(front + j * ms);
            i = L::LoadBack(back + j * ms);
        } else {
            r = L::Load(front + j * ms, s);
            i = L::Load(back + j * ms, -s);
        }
    }
};

// Output q is X[k + q m]; below the middle it is stored as it is, above as the conjugate of its
// mirror (r - q) m - k. The order of the two stores does not matter: they go to different columns.
template <class L, bool Unit, bool Masked = false>
struct PairColumnOut {
    using V = typename L::V;
    double* front;
    double* back;
    ptrdiff_t ms, s;
    int32_t r;
    int32_t keep;
    TW_FFT_INLINE void C(int32_t q, V re, V im) const {
        double* a = front + q * ms;
        double* b = back + (r - 1 - q) * ms;
        // Below the middle: re to the front, im to the back; above: re to the back, -im to the front.
        const bool low = 2 * q < r;
        const V f = low ? re : -im, g = low ? im : re;
        if constexpr (Masked) {
            L::StoreKeep(a, s, f, keep);
            L::StoreKeep(b, -s, g, keep);
        } else if constexpr (Unit) {
            L::StoreUnit(a, f);
            L::StoreBack(b, g);
        } else {
            L::Store(a, s, f);
            L::Store(b, -s, g);
        }
    }
};

// The middle column m/2 of a real combine (m even): real values times the twiddles
// exp(-i pi j / r), and only the outputs below the middle are kept.
struct MiddleColumnIn {
    const double* p;
    const double* wr;
    const double* wi;
    ptrdiff_t ms, wstep;
    TW_FFT_INLINE void C(int32_t j, double& re, double& im) const {
        if (j == 0) {
            re = p[0];
            im = 0.0;
        } else {
            const double v = p[j * ms];
            re = v * wr[j * wstep];
            im = v * wi[j * wstep];
        }
    }
};

struct MiddleColumnOut {
    double* p;
    ptrdiff_t ms;
    int32_t r;
    TW_FFT_INLINE void C(int32_t q, double re, double im) const {
        if (2 * q + 1 > r) return;
        p[q * ms] = re;
        if (2 * q + 1 < r) p[(r - 1 - q) * ms] = im;
    }
};

// The column pair (k, m-k) and the middle column of a real combine, with the lanes across
// combines that stand side by side, `lane` apart (see RealCombineLanesForm).
template <class L>
struct MemberPairIn {
    using V = typename L::V;
    const double* front;
    const double* back;
    ptrdiff_t ms, lane;
    TW_FFT_INLINE void C(int32_t j, V& r, V& i) const {
        r = L::Load(front + j * ms, lane);
        i = L::Load(back + j * ms, lane);
    }
};

template <class L>
struct MemberPairOut {
    using V = typename L::V;
    double* front;
    double* back;
    ptrdiff_t ms, lane;
    int32_t r;
    TW_FFT_INLINE void C(int32_t q, V re, V im) const {
        const bool low = 2 * q < r;
        L::Store(front + q * ms, lane, low ? re : -im);
        L::Store(back + (r - 1 - q) * ms, lane, low ? im : re);
    }
};

template <class L>
struct MemberMiddleIn {
    using V = typename L::V;
    const double* p;
    const double* wr;
    const double* wi;
    ptrdiff_t ms, wstep, lane;
    TW_FFT_INLINE void C(int32_t j, V& re, V& im) const {
        if (j == 0) {
            re = L::Load(p, lane);
            im = V{};
        } else {
            const V v = L::Load(p + j * ms, lane);
            re = v * L::Broadcast(wr + j * wstep);
            im = v * L::Broadcast(wi + j * wstep);
        }
    }
};

template <class L>
struct MemberMiddleOut {
    using V = typename L::V;
    double* p;
    ptrdiff_t ms, lane;
    int32_t r;
    TW_FFT_INLINE void C(int32_t q, V re, V im) const {
        if (2 * q + 1 > r) return;
        L::Store(p + q * ms, lane, re);
        if (2 * q + 1 < r) L::Store(p + (r - 1 - q) * ms, lane, im);
    }
};

// Scalar columns: on the stack for a compile-time radix, else the policy's scratch (4 radix f64).
template <int R>
struct Columns {
    template <class P>
    explicit Columns(const P&) {}
    double xr[R], xi[R], yr[R], yi[R];
};
template <>
struct Columns<0> {
    template <class P>
    explicit Columns(const P& p) : xr(p.columns), xi(xr + p.radix), yr(xi + p.radix), yi(yr + p.radix) {}
    double *xr, *xi, *yr, *yi;
};

// One DFT of the policy through the accessors. Vector lanes run the codelet's straight-line code
// with the accesses inlined; scalars go through columns to the policy's one scalar routine, so that
// the many scalar edges and remainders of the forms share one copy of the code.
template <class V, class P, class In, class Out>
TW_FFT_INLINE Status RunComplex(const P& p, const In& in, const Out& out) {
    if constexpr (!std::is_same_v<V, double>) {
        p.template Complex<V>(in, out);
        return 0;
    } else {
        Columns<P::kRadix> c(p);
        const int32_t r = p.radix;
        for (int32_t j = 0; j < r; ++j) in.C(j, c.xr[j], c.xi[j]);
        if (const Status s = p.Complex(c.xr, c.xi, c.yr, c.yi)) return s;
        for (int32_t k = 0; k < r; ++k) out.C(k, c.yr[k], c.yi[k]);
        return 0;
    }
}

template <class V, class P, class In, class Out>
TW_FFT_INLINE Status RunReal(const P& p, const In& in, const Out& out) {
    if constexpr (!std::is_same_v<V, double>) {
        p.template Real<V>(in, out);
        return 0;
    } else {
        Columns<P::kRadix> c(p);
        const int32_t r = p.radix;
        for (int32_t j = 0; j < r; ++j) in.R(j, c.xr[j]);
        if (const Status s = p.Real(c.xr, c.yr)) return s;
        for (int32_t k = 0; k < r; ++k) out.R(k, c.yr[k]);
        return 0;
    }
}

// The loops below run transforms `from` to `to`-1 in blocks of the lanes' width. What does not
// fill the last block runs first, as one block ending at `to`-1 that stores only its last lanes:
// its other lanes repeat transforms that a later block does (they must lie at `lowest` or above),
// and reading them before that block has written them keeps the wide loads clear of recent
// narrower stores. In place this is sound, since a block loads all its inputs before it stores.
// Returns where the whole blocks end: `to` when there is no such tail block.
// The lanes of the partial block that are stored: those from `skip` on.
template <class L>
inline int32_t TailLanes(int32_t skip) {
    return ((1 << L::kWidth) - 1) & ~((1 << skip) - 1);
}

// The leaves of the outlined radices leave their rest to the narrower lanes: a masked copy of
// their large blocks would double the code that the loop runs through the instruction cache, for
// a leaf that runs once. (Their combines run many partial blocks, one per call, and gain.)
template <class L, class P, bool Leaf>
constexpr bool TailBlocksFit() {
    if constexpr (L::kWidth > 1)
        return !(Leaf && P::kOutlined);
    else
        return false;
}
template <class L, class P, bool Leaf>
constexpr bool kTailBlocks = TailBlocksFit<L, P, Leaf>();

template <class L, class P, bool Leaf>
inline int32_t TailFirst(int32_t from, int32_t to, int32_t lowest) {
    if constexpr (!kTailBlocks<L, P, Leaf>) {
        return to;
    } else {
        const int32_t rest = (to - from) % L::kWidth;
        return rest != 0 && to - L::kWidth >= lowest ? to - rest : to;
    }
}

// A leaf of fewer sub-transforms than the widest lanes (2 or 3 of 4) runs as one block whose last
// lanes repeat the last sub-transform and are not stored. Only the inlined radices take it (the
// outlined ones would need one more copy each of their large blocks).
template <class L, class P>
constexpr bool ShortLeafFits() {
    if constexpr (std::is_same_v<typename L::Narrower, BaselineRest> && P::kRadix > 0)
        return !P::kOutlined;
    else
        return false;
}
template <class L, class P>
constexpr bool kShortLeaf = ShortLeafFits<L, P>();

template <class L>
struct ShortLeafLanes {
    int32_t keep;
    ptrdiff_t o[L::kWidth];
    ShortLeafLanes(int32_t count, ptrdiff_t lane) : keep((1 << count) - 1) {
        for (int32_t i = 0; i < L::kWidth; ++i) o[i] = (i < count ? i : count - 1) * lane;
    }
};

// Sub-transforms q0..q1-1 of a leaf: q reads in[(q + j count) inStride] and writes
// out[(q r + k) outStride]. Returns the first sub-transform not done.
template <class L, bool Pair, class P>
Status ComplexLeafLoop(const P& p, const double* inRe, const double* inIm, double* outRe, double* outIm,
                       ptrdiff_t is, ptrdiff_t os, int32_t count, int32_t& q) {
    if constexpr (kShortLeaf<L, P>) {
        if (q == 0 && count >= 2 && count < L::kWidth) {
            const ShortLeafLanes<L> lanes(count, is);
            const ptrdiff_t ro = static_cast<ptrdiff_t>(p.radix) * os;
            const OffsetComplexIn<L, Pair> in{inRe, inIm, static_cast<ptrdiff_t>(count) * is, lanes.o};
            const ComplexOut<L, Pair, true> out{outRe, outIm, os, ro, lanes.keep};
            q = count;
            return RunComplex<typename L::V>(p, in, out);
        }
    }
    const ptrdiff_t step = static_cast<ptrdiff_t>(count) * is, ro = static_cast<ptrdiff_t>(p.radix) * os;
    const int32_t end = TailFirst<L, P, true>(q, count, 0);
    if constexpr (kTailBlocks<L, P, true>) {
        if (end < count) {
            const int32_t q0 = count - L::kWidth;
            const ComplexIn<L, Pair> in{inRe + q0 * is, inIm + q0 * is, step, is};
            const ComplexOut<L, Pair, true> out{outRe + q0 * ro, outIm + q0 * ro, os, ro, TailLanes<L>(end - q0)};
            if (const Status s = RunComplex<typename L::V>(p, in, out)) return s;
        }
    }
    if constexpr (Pair && kUnitPairs<L>) {
        if (is == 2) {
            for (; q + L::kWidth <= end; q += L::kWidth) {
                const ptrdiff_t st = Opaque<P>(step), so = Opaque<P>(os), lo = Opaque<P>(ro);
                const CrossedPairOut<L> out{outRe + q * ro, so, lo};
                if (const Status s = RunComplex<typename L::V>(p, UnitPairIn<L>{inRe + q * is, st}, out)) return s;
            }
        }
    }
    for (; q + L::kWidth <= end; q += L::kWidth) {
        const ptrdiff_t st = Opaque<P>(step), li = Opaque<P>(is), so = Opaque<P>(os), lo = Opaque<P>(ro);
        const ComplexIn<L, Pair> in{inRe + q * is, inIm + q * is, st, li};
        const ComplexOut<L, Pair> out{outRe + q * ro, outIm + q * ro, so, lo, 0};
        if (const Status s = RunComplex<typename L::V>(p, in, out)) return s;
    }
    if (end < count) q = count;
    if constexpr (std::is_same_v<typename L::Narrower, BaselineRest>) {
        if (q < count) BaselineCodelets().leafComplexFrom[P::kRadix](inRe, inIm, outRe, outIm, is, os, count, q);
    } else if constexpr (L::kWidth > 1) {
        return ComplexLeafLoop<typename L::Narrower, Pair>(p, inRe, inIm, outRe, outIm, is, os, count, q);
    }
    return 0;
}

template <class L, bool Unit, class P>
Status RealLeafLoop(const P& p, const double* in, double* out, ptrdiff_t is, ptrdiff_t os, int32_t count,
                    int32_t& q) {
    if constexpr (kShortLeaf<L, P>) {
        if (q == 0 && count >= 2 && count < L::kWidth) {
            const ShortLeafLanes<L> lanes(count, is);
            const ptrdiff_t ro = static_cast<ptrdiff_t>(p.radix) * os;
            const OffsetRealIn<L> x{in, static_cast<ptrdiff_t>(count) * is, lanes.o};
            const RealOut<L, true> y{out, os, ro, lanes.keep};
            q = count;
            return RunReal<typename L::V>(p, x, y);
        }
    }
    const ptrdiff_t step = static_cast<ptrdiff_t>(count) * is, ro = static_cast<ptrdiff_t>(p.radix) * os;
    const int32_t end = TailFirst<L, P, true>(q, count, 0);
    if constexpr (kTailBlocks<L, P, true>) {
        if (end < count) {
            const int32_t q0 = count - L::kWidth;
            const RealIn<L, Unit> x{in + q0 * is, step, is};
            const RealOut<L, true> y{out + q0 * ro, os, ro, TailLanes<L>(end - q0)};
            if (const Status s = RunReal<typename L::V>(p, x, y)) return s;
        }
    }
    for (; q + L::kWidth <= end; q += L::kWidth) {
        const ptrdiff_t st = Opaque<P>(step), so = Opaque<P>(os), lo = Opaque<P>(ro);
        const RealIn<L, Unit> x{in + q * is, st, is};
        const RealOut<L> y{out + q * ro, so, lo, 0};
        if (const Status s = RunReal<typename L::V>(p, x, y)) return s;
    }
    if (end < count) q = count;
    if constexpr (std::is_same_v<typename L::Narrower, BaselineRest>) {
        if (q < count) BaselineCodelets().leafRealFrom[P::kRadix](in, out, is, os, count, q);
    } else if constexpr (L::kWidth > 1) {
        return RealLeafLoop<typename L::Narrower, Unit>(p, in, out, is, os, count, q);
    }
    return 0;
}

// Columns j..m-1 (j >= 1) of a complex combine.
template <class L, bool Pair, class P>
Status ComplexCombineLoop(const P& p, double* re, double* im, const double* twRe, const double* twIm,
                          ptrdiff_t s, int32_t m, int32_t& j) {
    const ptrdiff_t ms = static_cast<ptrdiff_t>(m) * s;
    // Columns from 1 on have twiddles, so the tail block may start at 1.
    const int32_t end = TailFirst<L, P, false>(j, m, 1);
    if constexpr (kTailBlocks<L, P, false>) {
        if (end < m) {
            const int32_t j0 = m - L::kWidth;
            const ptrdiff_t w = ColumnTwiddles(j0, m);
            const TwiddledIn<L, ComplexIn<L, Pair>> in{{re + j0 * s, im + j0 * s, ms, s}, twRe + w, twIm + w, m - 1};
            const ComplexOut<L, Pair, true> out{re + j0 * s, im + j0 * s, ms, s, TailLanes<L>(end - j0)};
            if (const Status st = RunComplex<typename L::V>(p, in, out)) return st;
        }
    }
    if constexpr (Pair && kUnitPairs<L>) {
        if (s == 2) {
            for (; j + L::kWidth <= end; j += L::kWidth) {
                const ptrdiff_t w = ColumnTwiddles(j, m), rs = Opaque<P>(ms), ws = Opaque<P, ptrdiff_t>(m - 1);
                const TwiddledIn<L, UnitPairIn<L>, TwiddleLanes::Crossed> in{{re + j * s, rs}, twRe + w, twIm + w, ws};
                if (const Status st = RunComplex<typename L::V>(p, in, UnitPairOut<L>{re + j * s, rs})) return st;
            }
        }
    }
    for (; j + L::kWidth <= end; j += L::kWidth) {
        const ptrdiff_t w = ColumnTwiddles(j, m), rs = Opaque<P>(ms), ls = Opaque<P>(s), ws = Opaque<P, ptrdiff_t>(m - 1);
        const TwiddledIn<L, ComplexIn<L, Pair>> in{{re + j * s, im + j * s, rs, ls}, twRe + w, twIm + w, ws};
        const ComplexOut<L, Pair> out{re + j * s, im + j * s, rs, ls, 0};
        if (const Status st = RunComplex<typename L::V>(p, in, out)) return st;
    }
    if (end < m) j = m;
    if constexpr (std::is_same_v<typename L::Narrower, BaselineRest>) {
        if (j < m) BaselineCodelets().combineComplexFrom[P::kRadix](re, im, twRe, twIm, s, m, j);
    } else if constexpr (L::kWidth > 1) {
        return ComplexCombineLoop<typename L::Narrower, Pair>(p, re, im, twRe, twIm, s, m, j);
    }
    return 0;
}

// Column pairs (k, m-k) for k from k up to `pairs` of a real combine.
template <class L, bool Unit, class P>
Status RealCombinePairs(const P& p, double* data, const double* twRe, const double* twIm, ptrdiff_t s,
                        int32_t m, int32_t pairs, int32_t& k) {
    const int32_t r = p.radix;
    const ptrdiff_t ms = static_cast<ptrdiff_t>(m) * s;
    const int32_t end = TailFirst<L, P, false>(k, pairs + 1, 1);
    if constexpr (kTailBlocks<L, P, false>) {
        if (end <= pairs) {
            const int32_t k0 = pairs + 1 - L::kWidth;
            const ptrdiff_t w = ColumnTwiddles(k0, m);
            double* front = data + k0 * s;
            double* back = data + (m - k0) * s;
            const TwiddledIn<L, PairColumnIn<L, Unit>> in{{front, back, ms, s}, twRe + w, twIm + w, m - 1};
            const PairColumnOut<L, Unit, true> out{front, back, ms, s, r, TailLanes<L>(end - k0)};
            if (const Status st = RunComplex<typename L::V>(p, in, out)) return st;
        }
    }
    for (; k + L::kWidth <= end; k += L::kWidth) {
        const ptrdiff_t w = ColumnTwiddles(k, m);
        double* front = data + k * s;
        double* back = data + (m - k) * s;
        const ptrdiff_t rs = Opaque<P>(ms), ls = Opaque<P>(s), ws = Opaque<P, ptrdiff_t>(m - 1);
        const TwiddledIn<L, PairColumnIn<L, Unit>> in{{front, back, rs, ls}, twRe + w, twIm + w, ws};
        const PairColumnOut<L, Unit> out{front, back, rs, ls, r, 0};
        if (const Status st = RunComplex<typename L::V>(p, in, out)) return st;
    }
    if (end <= pairs) k = pairs + 1;
    if constexpr (std::is_same_v<typename L::Narrower, BaselineRest>) {
        if (k <= pairs) BaselineCodelets().combineRealFrom[P::kRadix](data, twRe, twIm, s, m, k);
    } else if constexpr (L::kWidth > 1) {
        return RealCombinePairs<typename L::Narrower, Unit>(p, data, twRe, twIm, s, m, pairs, k);
    }
    return 0;
}

// Column 0 (a real DFT without twiddles) and, for even m, the middle column m/2, whose real
// values times the twiddles exp(-i pi j / r) give the half-frequency outputs.
template <class P>
Status RealCombineEdges(const P& p, double* data, const double* twRe, const double* twIm, ptrdiff_t s,
                        int32_t m) {
    const int32_t r = p.radix;
    const ptrdiff_t ms = static_cast<ptrdiff_t>(m) * s;
    if (const Status st = RunReal<double>(p, RealIn<ScalarLanes, false>{data, ms, 0}, RealOut<ScalarLanes>{data, ms, 0, 0}))
        return st;
    if (m % 2 != 0) return 0;
    const ptrdiff_t w = ColumnTwiddles(m / 2, m);
    double* mid = data + (m / 2) * s;
    return RunComplex<double>(p, MiddleColumnIn{mid, twRe + w, twIm + w, ms, m - 1}, MiddleColumnOut{mid, ms, r});
}

// Whole forms, and the forms from sub-transform or column `from` on. Interleaved complex data take
// the pair loads, unit strides the unit loads; a codelet's vector lanes serve as many transforms as
// fill them, narrower lanes and scalars the rest.
template <class L, class P>
Status ComplexLeafForm(const P& p, const double* inRe, const double* inIm, double* outRe, double* outIm,
                       ptrdiff_t is, ptrdiff_t os, int32_t count, int32_t from = 0) {
    int32_t q = from;
    if constexpr (L::kWidth > 1) {
        if (inIm == inRe + 1 && outIm == outRe + 1)
            return ComplexLeafLoop<L, true>(p, inRe, inIm, outRe, outIm, is, os, count, q);
    }
    return ComplexLeafLoop<L, false>(p, inRe, inIm, outRe, outIm, is, os, count, q);
}

template <class L, class P>
Status RealLeafForm(const P& p, const double* in, double* out, ptrdiff_t is, ptrdiff_t os, int32_t count,
                    int32_t from = 0) {
    int32_t q = from;
    if constexpr (L::kWidth > 1) {
        if (is == 1) return RealLeafLoop<L, true>(p, in, out, is, os, count, q);
    }
    return RealLeafLoop<L, false>(p, in, out, is, os, count, q);
}

// `group` leaves side by side, leaf g at in + g inLane and out + g outLane, each as the form
// above. The vector lanes run across the leaves, not across one leaf's sub-transforms: in a long
// transform the leaves of neighbouring top-level sub-transforms read neighbouring inputs, so one
// cache line feeds them all, where one leaf alone would use one value of each line it fetches.
// Every DFT is the one the single leaves compute, so no result bit depends on the grouping.
template <class L, class P>
void RealLeafLanesForm(const P& p, const double* in, double* out, ptrdiff_t is, ptrdiff_t os, int32_t count,
                       int32_t group, ptrdiff_t il, ptrdiff_t ol) {
    int32_t g = 0;
    if constexpr (L::kWidth > 1) {
        const ptrdiff_t step = static_cast<ptrdiff_t>(count) * is, ro = static_cast<ptrdiff_t>(p.radix) * os;
        const int32_t whole = group - group % L::kWidth;
        for (int32_t q = 0; q < count && whole > 0; ++q) {
            for (int32_t h = 0; h < whole; h += L::kWidth) {
                const double* x = in + q * is + h * il;
                double* y = out + q * ro + h * ol;
                const ptrdiff_t st = Opaque<P>(step), li = Opaque<P>(il), so = Opaque<P>(os), lo = Opaque<P>(ol);
                if (il == 1)
                    RunReal<typename L::V>(p, RealIn<L, true>{x, st, 1}, RealOut<L>{y, so, lo, 0});
                else
                    RunReal<typename L::V>(p, RealIn<L, false>{x, st, li}, RealOut<L>{y, so, lo, 0});
            }
        }
        g = whole;
    }
    for (; g < group; ++g) RealLeafForm<L>(p, in + g * il, out + g * ol, is, os, count);
}

template <class L, class P>
void ComplexLeafLanesForm(const P& p, const double* inRe, const double* inIm, double* outRe, double* outIm,
                          ptrdiff_t is, ptrdiff_t os, int32_t count, int32_t group, ptrdiff_t il,
                          ptrdiff_t ol) {
    int32_t g = 0;
    if constexpr (L::kWidth > 1) {
        const ptrdiff_t step = static_cast<ptrdiff_t>(count) * is, ro = static_cast<ptrdiff_t>(p.radix) * os;
        const int32_t whole = group - group % L::kWidth;
        const bool pair = inIm == inRe + 1 && outIm == outRe + 1;
        for (int32_t q = 0; q < count && whole > 0; ++q) {
            for (int32_t h = 0; h < whole; h += L::kWidth) {
                const ptrdiff_t x = q * is + h * il, y = q * ro + h * ol;
                const ptrdiff_t st = Opaque<P>(step), li = Opaque<P>(il), so = Opaque<P>(os), lo = Opaque<P>(ol);
                if constexpr (kUnitPairs<L>) {
                    if (pair && il == 2) {
                        RunComplex<typename L::V>(p, UnitPairIn<L>{inRe + x, st}, CrossedPairOut<L>{outRe + y, so, lo});
                        continue;
                    }
                }
                if (pair)
                    RunComplex<typename L::V>(p, ComplexIn<L, true>{inRe + x, inIm + x, st, li},
                                              ComplexOut<L, true>{outRe + y, outIm + y, so, lo, 0});
                else
                    RunComplex<typename L::V>(p, ComplexIn<L, false>{inRe + x, inIm + x, st, li},
                                              ComplexOut<L, false>{outRe + y, outIm + y, so, lo, 0});
            }
        }
        g = whole;
    }
    for (; g < group; ++g)
        ComplexLeafForm<L>(p, inRe + g * il, inIm + g * il, outRe + g * ol, outIm + g * ol, is, os, count);
}

// `group` complex combines side by side, combine g at re + g lane (im likewise). The vector lanes
// run across the combines, column by column, with each column's twiddles shared: a short combine
// fills them where its own few columns would leave partial blocks and a scalar column 0. Every DFT
// is the one the single combines compute. Interleaved data only (the Rader groups' scratch); split
// data run one by one.
template <class L, class P>
void ComplexCombineLanesLoop(const P& p, double* re, double* im, const double* twRe, const double* twIm,
                             ptrdiff_t s, int32_t m, int32_t whole, ptrdiff_t lane) {
    const ptrdiff_t ms = static_cast<ptrdiff_t>(m) * s;
    for (int32_t h = 0; h < whole; h += L::kWidth) {
        double* r = re + h * lane;
        double* i = im + h * lane;
        RunComplex<typename L::V>(p, ComplexIn<L, true>{r, i, ms, lane}, ComplexOut<L, true>{r, i, ms, lane, 0});
        for (int32_t j = 1; j < m; ++j) {
            const ptrdiff_t w = ColumnTwiddles(j, m), rs = Opaque<P>(ms), ls = Opaque<P>(lane);
            const TwiddledIn<L, ComplexIn<L, true>, TwiddleLanes::Shared> in{{r + j * s, i + j * s, rs, ls}, twRe + w, twIm + w, m - 1};
            RunComplex<typename L::V>(p, in, ComplexOut<L, true>{r + j * s, i + j * s, rs, ls, 0});
        }
    }
}

template <class L, class P>
void ComplexCombineLanesForm(const P& p, double* re, double* im, const double* twRe, const double* twIm,
                             ptrdiff_t s, int32_t m, int32_t group, ptrdiff_t lane) {
    int32_t g = 0;
    if constexpr (L::kWidth > 1) {
        if (im == re + 1) {
            g = group - group % L::kWidth;
            ComplexCombineLanesLoop<L>(p, re, im, twRe, twIm, s, m, g, lane);
        }
    }
    for (; g < group; ++g) ComplexCombineForm<L>(p, re + g * lane, im + g * lane, twRe, twIm, s, m);
}

// `group` real combines side by side, combine g at data + g lane, with the vector lanes across
// the combines as in ComplexCombineLanesForm: column 0, the column pairs and the middle column
// each take one block per four combines. For the outlined radices only, whose scalar column 0 and
// middle column cost each combine as much as two vector blocks; the small ones do better alone,
// where their columns load whole.
template <class L, class P>
void RealCombineLanesForm(const P& p, double* data, const double* twRe, const double* twIm, ptrdiff_t s,
                          int32_t m, int32_t group, ptrdiff_t lane) {
    int32_t g = 0;
    if constexpr (L::kWidth > 1 && P::kOutlined) {
        using V = typename L::V;
        const int32_t r = p.radix;
        const ptrdiff_t ms = static_cast<ptrdiff_t>(m) * s;
        for (; g + L::kWidth <= group; g += L::kWidth) {
            double* d = data + g * lane;
            RunReal<V>(p, RealIn<L, false>{d, ms, lane}, RealOut<L>{d, ms, lane, 0});
            for (int32_t k = 1; k <= (m - 1) / 2; ++k) {
                const ptrdiff_t w = ColumnTwiddles(k, m), rs = Opaque<P>(ms), ls = Opaque<P>(lane);
                double* front = d + k * s;
                double* back = d + (m - k) * s;
                const TwiddledIn<L, MemberPairIn<L>, TwiddleLanes::Shared> in{{front, back, rs, ls}, twRe + w, twIm + w, m - 1};
                RunComplex<V>(p, in, MemberPairOut<L>{front, back, rs, ls, r});
            }
            if (m % 2 == 0) {
                const ptrdiff_t w = ColumnTwiddles(m / 2, m);
                double* mid = d + (m / 2) * s;
                RunComplex<V>(p, MemberMiddleIn<L>{mid, twRe + w, twIm + w, ms, m - 1, lane},
                              MemberMiddleOut<L>{mid, ms, lane, r});
            }
        }
    }
    for (; g < group; ++g) RealCombineForm<L>(p, data + g * lane, twRe, twIm, s, m);
}

// Combines whose rows lie far apart (the upper levels of long transforms) run in chunks of
// kChunk columns copied into a buffer: rows a power of two apart would fall into one cache set, and
// every block would fetch its rows again from far out. The arithmetic is the same, on the copies.
// The copies move values in the widths the kernels load and store them, so that no load straddles
// stores of another width.
inline constexpr int32_t kChunk = 16;
inline constexpr ptrdiff_t kChunkedRows = 512;  // f64 between rows from which combines go through the buffer
inline constexpr int32_t kChunkedRadix = 8;     // fewer rows share the cache sets without harm

// Interleaved complex data at unit complex stride (s = 2): columns from..(whole chunks) of a
// complex combine. Returns the first column not done.
template <class L, class P>
int32_t ComplexCombineChunks(const P& p, double* data, const double* twRe, const double* twIm, int32_t m,
                             int32_t from) {
    constexpr int32_t R = P::kRadix, C = kChunk;
    const ptrdiff_t ms = 2 * static_cast<ptrdiff_t>(m);
    double buf[R * 2 * C];
    int32_t j0 = from;
    for (; j0 + C <= m; j0 += C) {
        for (int32_t i = 0; i < R; ++i)
            for (int32_t c = 0; c < 2 * C; c += 2) _mm_storeu_pd(buf + i * 2 * C + c, _mm_loadu_pd(data + i * ms + 2 * j0 + c));
        for (int32_t j = 0; j < C; j += L::kWidth) {
            const ptrdiff_t w = ColumnTwiddles(j0 + j, m);
            if constexpr (kUnitPairs<L>) {
                const TwiddledIn<L, UnitPairIn<L>, TwiddleLanes::Crossed> in{{buf + 2 * j, 2 * C}, twRe + w, twIm + w, m - 1};
                RunComplex<typename L::V>(p, in, UnitPairOut<L>{buf + 2 * j, 2 * C});
            } else {
                const TwiddledIn<L, ComplexIn<L, true>> in{{buf + 2 * j, buf + 2 * j + 1, 2 * C, 2}, twRe + w, twIm + w,
                                                           m - 1};
                const ComplexOut<L, true> out{buf + 2 * j, buf + 2 * j + 1, 2 * C, 2, 0};
                RunComplex<typename L::V>(p, in, out);
            }
        }
        for (int32_t i = 0; i < R; ++i)
            for (int32_t c = 0; c < 2 * C; c += 2) _mm_storeu_pd(data + i * ms + 2 * j0 + c, _mm_loadu_pd(buf + i * 2 * C + c));
    }
    return j0;
}

// Unit stride: column pairs from..(whole chunks) of a real combine; a chunk's buffer row holds the
// front columns k0..k0+C-1 and behind them the back columns m-k0-C+1..m-k0. Returns the first pair
// not done.
template <class L, class P>
int32_t RealCombineChunks(const P& p, double* data, const double* twRe, const double* twIm, int32_t m,
                          int32_t pairs, int32_t from) {
    constexpr int32_t R = P::kRadix, C = kChunk, W = L::kWidth;
    const ptrdiff_t ms = m;
    double buf[R * 2 * C];
    int32_t k0 = from;
    for (; k0 + C - 1 <= pairs; k0 += C) {
        const ptrdiff_t back = m - k0 - C + 1;
        for (int32_t i = 0; i < R; ++i) {
            for (int32_t c = 0; c < C; c += W) {
                L::StoreUnit(buf + i * 2 * C + c, L::LoadUnit(data + i * ms + k0 + c));
                L::StoreUnit(buf + i * 2 * C + C + c, L::LoadUnit(data + i * ms + back + c));
            }
        }
        for (int32_t k = 0; k < C; k += W) {
            const ptrdiff_t w = ColumnTwiddles(k0 + k, m);
            double* front = buf + k;
            double* mirror = buf + 2 * C - 1 - k;
            const TwiddledIn<L, PairColumnIn<L, true>> in{{front, mirror, 2 * C, 1}, twRe + w, twIm + w, m - 1};
            const PairColumnOut<L, true> out{front, mirror, 2 * C, 1, R, 0};
            RunComplex<typename L::V>(p, in, out);
        }
        for (int32_t i = 0; i < R; ++i) {
            for (int32_t c = 0; c < C; c += W) {
                L::StoreUnit(data + i * ms + k0 + c, L::LoadUnit(buf + i * 2 * C + c));
                L::StoreUnit(data + i * ms + back + c, L::LoadUnit(buf + i * 2 * C + C + c));
            }
        }
    }
    return k0;
}

template <class L, class P>
Status ComplexCombineColumns(const P& p, double* re, double* im, const double* twRe, const double* twIm,
                             ptrdiff_t s, int32_t m, int32_t from) {
    int32_t j = from;
    if constexpr (L::kWidth > 1 && P::kRadix >= kChunkedRadix) {
        if (im == re + 1 && s == 2 && 2 * static_cast<ptrdiff_t>(m) >= kChunkedRows)
            j = ComplexCombineChunks<L>(p, re, twRe, twIm, m, j);
    }
    if constexpr (L::kWidth > 1) {
        if (im == re + 1) return ComplexCombineLoop<L, true>(p, re, im, twRe, twIm, s, m, j);
    }
    return ComplexCombineLoop<L, false>(p, re, im, twRe, twIm, s, m, j);
}

template <class L, class P>
Status ComplexCombineForm(const P& p, double* re, double* im, const double* twRe, const double* twIm,
                          ptrdiff_t s, int32_t m) {
    const ptrdiff_t ms = static_cast<ptrdiff_t>(m) * s;
    if (const Status st = RunComplex<double>(p, ComplexIn<ScalarLanes, false>{re, im, ms, 0},
                                             ComplexOut<ScalarLanes, false>{re, im, ms, 0, 0}))
        return st;
    return ComplexCombineColumns<L>(p, re, im, twRe, twIm, s, m, 1);
}

template <class L, class P>
Status RealCombinePairsFrom(const P& p, double* data, const double* twRe, const double* twIm, ptrdiff_t s,
                            int32_t m, int32_t from) {
    int32_t k = from;
    if constexpr (L::kWidth > 1 && P::kRadix >= kChunkedRadix) {
        if (s == 1 && m >= kChunkedRows) k = RealCombineChunks<L>(p, data, twRe, twIm, m, (m - 1) / 2, k);
    }
    if constexpr (L::kWidth > 1) {
        if (s == 1) return RealCombinePairs<L, true>(p, data, twRe, twIm, s, m, (m - 1) / 2, k);
    }
    return RealCombinePairs<L, false>(p, data, twRe, twIm, s, m, (m - 1) / 2, k);
}

template <class L, class P>
Status RealCombineForm(const P& p, double* data, const double* twRe, const double* twIm, ptrdiff_t s,
                       int32_t m) {
    if (const Status st = RealCombineEdges(p, data, twRe, twIm, s, m)) return st;
    return RealCombinePairsFrom<L>(p, data, twRe, twIm, s, m, 1);
}

}  // namespace tw::fft::TW_FFT_ISA
