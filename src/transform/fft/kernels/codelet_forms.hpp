// The codelet policy and the table entries of one lane type. Included by one source file per
// instruction set and radix group, each in its own namespace (TW_FFT_ISA, see lanes.hpp) so that
// nothing compiled for a wider set is shared.
#pragma once

#include <utility>

#include "transform/fft/kernels/codelets.hpp"
#include "transform/fft/kernels/dft_blocks.hpp"
#include "transform/fft/kernels/loops.hpp"

namespace tw::fft::TW_FFT_ISA {

struct ArrayIn {
    const double* re;
    const double* im;
    TW_FFT_INLINE void C(int32_t j, double& r, double& i) const {
        r = re[j];
        i = im[j];
    }
    TW_FFT_INLINE void R(int32_t j, double& x) const { x = re[j]; }
};
struct ArrayOut {
    double* re;
    double* im;
    TW_FFT_INLINE void C(int32_t k, double r, double i) const {
        re[k] = r;
        im[k] = i;
    }
    TW_FFT_INLINE void R(int32_t k, double y) const { re[k] = y; }
};

template <int R>
struct CodeletDft {
    static constexpr int kRadix = R;
    static constexpr int32_t radix = R;
    // The large radices run out of line: inside the loop, every load would be checked against every
    // store of the previous pass, which makes compile time grow with the square of the radix.
    static constexpr bool kOutlined = R > 16;
    template <class V, class In, class Out>
    __attribute__((noinline, aligned(64))) static void OutlinedComplex(const In& in, const Out& out) {
        const In i = in;
        const Out o = out;
        DftBlock<R>::template Complex<V>(i, o);
    }
    template <class V, class In, class Out>
    __attribute__((noinline, aligned(64))) static void OutlinedReal(const In& in, const Out& out) {
        const In i = in;
        const Out o = out;
        DftBlock<R>::template Real<V>(i, o);
    }
    template <class V, class In, class Out>
    TW_FFT_INLINE void Complex(const In& in, const Out& out) const {
        if constexpr (kOutlined)
            OutlinedComplex<V>(in, out);
        else
            DftBlock<R>::template Complex<V>(in, out);
    }
    template <class V, class In, class Out>
    TW_FFT_INLINE void Real(const In& in, const Out& out) const {
        if constexpr (kOutlined)
            OutlinedReal<V>(in, out);
        else
            DftBlock<R>::template Real<V>(in, out);
    }
    // The scalar routines on columns, one copy per radix.
    __attribute__((noinline)) Status Complex(const double* xr, const double* xi, double* yr, double* yi) const {
        DftBlock<R>::template Complex<double>(ArrayIn{xr, xi}, ArrayOut{yr, yi});
        return 0;
    }
    __attribute__((noinline)) Status Real(const double* x, double* y) const {
        DftBlock<R>::template Real<double>(ArrayIn{x, nullptr}, ArrayOut{y, nullptr});
        return 0;
    }
};

template <class L>
struct CodeletForms {
    template <int R>
    static void RealLeaf(const double* in, double* out, ptrdiff_t is, ptrdiff_t os, int32_t count) {
        RealLeafForm<L>(CodeletDft<R>{}, in, out, is, os, count);
    }
    template <int R>
    static void RealCombine(double* data, const double* twRe, const double* twIm, ptrdiff_t s, int32_t m) {
        RealCombineForm<L>(CodeletDft<R>{}, data, twRe, twIm, s, m);
    }
    template <int R>
    static void ComplexLeaf(const double* inRe, const double* inIm, double* outRe, double* outIm,
                            ptrdiff_t is, ptrdiff_t os, int32_t count) {
        ComplexLeafForm<L>(CodeletDft<R>{}, inRe, inIm, outRe, outIm, is, os, count);
    }
    template <int R>
    static void ComplexCombine(double* re, double* im, const double* twRe, const double* twIm,
                               ptrdiff_t s, int32_t m) {
        ComplexCombineForm<L>(CodeletDft<R>{}, re, im, twRe, twIm, s, m);
    }

    template <int R>
    static void RealLeafFrom(const double* in, double* out, ptrdiff_t is, ptrdiff_t os, int32_t count,
                             int32_t from) {
        RealLeafForm<L>(CodeletDft<R>{}, in, out, is, os, count, from);
    }
    template <int R>
    static void RealCombineFrom(double* data, const double* twRe, const double* twIm, ptrdiff_t s, int32_t m,
                                int32_t from) {
        RealCombinePairsFrom<L>(CodeletDft<R>{}, data, twRe, twIm, s, m, from);
    }
    template <int R>
    static void ComplexLeafFrom(const double* inRe, const double* inIm, double* outRe, double* outIm,
                                ptrdiff_t is, ptrdiff_t os, int32_t count, int32_t from) {
        ComplexLeafForm<L>(CodeletDft<R>{}, inRe, inIm, outRe, outIm, is, os, count, from);
    }
    template <int R>
    static void ComplexCombineFrom(double* re, double* im, const double* twRe, const double* twIm,
                                   ptrdiff_t s, int32_t m, int32_t from) {
        ComplexCombineColumns<L>(CodeletDft<R>{}, re, im, twRe, twIm, s, m, from);
    }

    template <int R>
    static void RealLeafLanes(const double* in, double* out, ptrdiff_t is, ptrdiff_t os, int32_t count,
                              int32_t group, ptrdiff_t il, ptrdiff_t ol) {
        RealLeafLanesForm<L>(CodeletDft<R>{}, in, out, is, os, count, group, il, ol);
    }
    template <int R>
    static void ComplexLeafLanes(const double* inRe, const double* inIm, double* outRe, double* outIm,
                                 ptrdiff_t is, ptrdiff_t os, int32_t count, int32_t group, ptrdiff_t il,
                                 ptrdiff_t ol) {
        ComplexLeafLanesForm<L>(CodeletDft<R>{}, inRe, inIm, outRe, outIm, is, os, count, group, il, ol);
    }

    template <int R>
    static void RealCombineLanes(double* data, const double* twRe, const double* twIm, ptrdiff_t s, int32_t m,
                                 int32_t group, ptrdiff_t lane) {
        RealCombineLanesForm<L>(CodeletDft<R>{}, data, twRe, twIm, s, m, group, lane);
    }
    template <int R>
    static void ComplexCombineLanes(double* re, double* im, const double* twRe, const double* twIm, ptrdiff_t s,
                                    int32_t m, int32_t group, ptrdiff_t lane) {
        ComplexCombineLanesForm<L>(CodeletDft<R>{}, re, im, twRe, twIm, s, m, group, lane);
    }

    template <int... R>
    static void Put(CodeletTables& t, std::integer_sequence<int, R...>) {
        ((t.leafReal[R] = &RealLeaf<R>, t.combineReal[R] = &RealCombine<R>, t.leafComplex[R] = &ComplexLeaf<R>,
          t.combineComplex[R] = &ComplexCombine<R>, t.leafRealFrom[R] = &RealLeafFrom<R>,
          t.combineRealFrom[R] = &RealCombineFrom<R>, t.leafComplexFrom[R] = &ComplexLeafFrom<R>,
          t.combineComplexFrom[R] = &ComplexCombineFrom<R>, t.leafRealLanes[R] = &RealLeafLanes<R>,
          t.leafComplexLanes[R] = &ComplexLeafLanes<R>, t.combineRealLanes[R] = &RealCombineLanes<R>,
          t.combineComplexLanes[R] = &ComplexCombineLanes<R>),
         ...);
    }
};

}  // namespace tw::fft::TW_FFT_ISA
