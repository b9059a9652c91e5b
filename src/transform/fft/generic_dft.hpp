// The DFT policy of the stages without codelets: direct odd DFTs and Rader's algorithm. Its
// columns and work vectors come from one scratch block per kernel call.
#pragma once

#include "transform/fft/fft.hpp"

namespace tw::fft {

struct GenericDft {
    static constexpr int kRadix = 0;
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
// Rader's DFT reads input j at x[j xs] and writes output k to y[k ys] (x and y apart); work holds
// 4 p f64.
Status RaderComplex(const FftStage* st, int32_t p, const double* xr, const double* xi, ptrdiff_t xs,
                    double* yr, double* yi, ptrdiff_t ys, double* work);
Status RaderReal(const FftStage* st, int32_t p, const double* x, ptrdiff_t xs, double* y, ptrdiff_t ys,
                 double* work);

}  // namespace tw::fft
