// The DFT policy of the stages without codelets: direct odd DFTs and Rader's algorithm. Its
// columns and work vectors come from one scratch block per kernel call.
#pragma once

#include "transform/fft/fft.hpp"

namespace tw::fft {

struct GenericDft {
    static constexpr int kRadix = 0;
    static constexpr bool kOutlined = true;  // its DFTs are calls, as those of the large codelets
    int32_t radix;
    int32_t kind;
    const FftStage* stage;
    double* columns;  // 4 radix: xr, xi, yr, yi of the loops
    double* work;     // 4 radix

    Status Complex(const double* xr, const double* xi, double* yr, double* yi) const;
    Status Real(const double* x, double* y) const;
};

// f64 needed by one GenericDft of radix p.
inline size_t GenericScratch(int32_t p) { return 8 * static_cast<size_t>(p); }

Status OddComplex(const FftStage* st, int32_t p, const double* xr, const double* xi, double* yr,
                  double* yi, double* work);
Status OddReal(const FftStage* st, int32_t p, const double* x, double* y, double* work);
// Rader's DFTs of a group of `group` (1 to kRaderGroup) members: input j of member g at
// x[g xl + j xs], its output k to y[g yl + k ys] (x and y apart); work holds 4 p group f64.
inline constexpr int32_t kRaderGroup = 4;
Status RaderComplex(const FftStage* st, int32_t p, const double* xr, const double* xi, ptrdiff_t xs,
                    ptrdiff_t xl, double* yr, double* yi, ptrdiff_t ys, ptrdiff_t yl, int32_t group,
                    double* work);
Status RaderReal(const FftStage* st, int32_t p, const double* x, ptrdiff_t xs, ptrdiff_t xl, double* y,
                 ptrdiff_t ys, ptrdiff_t yl, int32_t group, double* work);

// `group` forward transforms on one table side by side: transform g reads from in + g il and
// writes to out + g ol, at the strides of one. Each gives the bits of the single transform.
Status ComplexForwardGroup(const FftTable* t, const double* inRe, const double* inIm, double* outRe,
                           double* outIm, ptrdiff_t is, ptrdiff_t os, int32_t group, ptrdiff_t il, ptrdiff_t ol);
Status RealForwardGroup(const FftTable* t, const double* in, double* out, ptrdiff_t is, ptrdiff_t os,
                        int32_t group, ptrdiff_t il, ptrdiff_t ol);

}  // namespace tw::fft
