// The codelet policy and the tables of one lane type. Included by one source file per instruction
// set, each in its own namespace so that nothing compiled for a wider set is shared.
#pragma once

#include <utility>

#include "transform/fft/kernels/codelets.hpp"
#include "transform/fft/kernels/dft_blocks.hpp"
#include "transform/fft/kernels/loops.hpp"

namespace tw::fft {

template <int R>
struct CodeletDft {
    static constexpr int kRadix = R;
    static constexpr int32_t radix = R;
    template <class V>
    Status Complex(const V* xr, const V* xi, V* yr, V* yi) const {
        DftBlock<R>::Complex(xr, xi, yr, yi);
        return 0;
    }
    template <class V>
    Status Real(const V* x, V* y) const {
        DftBlock<R>::Real(x, y);
        return 0;
    }
};

template <class L>
struct CodeletForms {
    template <int R>
    static void RealLeaf(const double* in, double* out, ptrdiff_t is, ptrdiff_t os, int32_t count) {
        CodeletDft<R> p;
        RealLeafForm<L>(p, in, out, is, os, count);
    }
    template <int R>
    static void RealCombine(double* data, const double* twRe, const double* twIm, ptrdiff_t s, int32_t m) {
        CodeletDft<R> p;
        RealCombineForm<L>(p, data, twRe, twIm, s, m);
    }
    template <int R>
    static void ComplexLeaf(const double* inRe, const double* inIm, double* outRe, double* outIm,
                            ptrdiff_t is, ptrdiff_t os, int32_t count) {
        CodeletDft<R> p;
        ComplexLeafForm<L>(p, inRe, inIm, outRe, outIm, is, os, count);
    }
    template <int R>
    static void ComplexCombine(double* re, double* im, const double* twRe, const double* twIm,
                               ptrdiff_t s, int32_t m) {
        CodeletDft<R> p;
        ComplexCombineForm<L>(p, re, im, twRe, twIm, s, m);
    }

    template <int R>
    static void Put(CodeletTables& t) {
        t.leafReal[R] = &RealLeaf<R>;
        t.combineReal[R] = &RealCombine<R>;
        t.leafComplex[R] = &ComplexLeaf<R>;
        t.combineComplex[R] = &ComplexCombine<R>;
    }

    static CodeletTables Make() {
        CodeletTables t{};
        [&]<int... R>(std::integer_sequence<int, R...>) { (Put<R>(t), ...); }(
            std::integer_sequence<int, 2, 3, 4, 5, 7, 8, 9, 10, 11, 13, 14, 16, 17, 18, 19, 29, 31, 32,
                                  37, 41, 43>{});
        return t;
    }
};

}  // namespace tw::fft
