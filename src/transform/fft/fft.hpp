// The library's FFT: shared tables of every length and the transforms that run on them.
//
// Data are f64 with a stride, so that one kernel serves plain vectors, interleaved complex data
// (two pointers one f64 apart, stride 2) and matrix columns. Real transforms use the half-complex
// packing: element 0 is Re X[0], element k is Re X[k] and element n-k is Im X[k] for
// 1 <= k <= (n-1)/2, and for even n element n/2 is Re X[n/2].
#pragma once

#include <complex>
#include <cstddef>
#include <cstdint>

#include "frame/memory.hpp"
#include "twanlys/fft.h"

namespace tw {

enum FftKind : int32_t { KindCodelet = 0, KindOdd = 1, KindRader = 2 };

inline constexpr int kFftMaxStages = 20;
inline constexpr int kFftMaxRadix = 43;

using FftRealLeaf = void (*)(const double* in, double* out, ptrdiff_t inStride, ptrdiff_t outStride,
                             int32_t count);
using FftRealCombine = void (*)(double* data, const double* twRe, const double* twIm, ptrdiff_t stride,
                                int32_t m);
using FftComplexLeaf = void (*)(const double* inRe, const double* inIm, double* outRe, double* outIm,
                                ptrdiff_t inStride, ptrdiff_t outStride, int32_t count);
using FftComplexCombine = void (*)(double* re, double* im, const double* twRe, const double* twIm,
                                   ptrdiff_t stride, int32_t m);

}  // namespace tw

// The plan of one length; immutable once built, shared through the list by reference count.
struct FftStage {
    double* oddCos;
    double* oddSin;
    double* twiddleRe;
    double* twiddleIm;
    FftTable* raderTable;
    double* raderKernelRe;
    double* raderKernelIm;
    int32_t* raderGather;
    int32_t* raderScatter;
    // The twiddles once more, in the order the combine kernels read them: the pair for (j, k)
    // at (k-1)(m-1) + (j-1), so that neighbouring columns j are neighbours in memory.
    double* laneTwiddleRe;
    double* laneTwiddleIm;
    // KindRader: the kernel once more as (c, -c, d, d) per value, the factors of the conjugating
    // product in the order one vector of an interleaved element takes them.
    double* raderKernelPairs;
};

struct FftTable {
    int32_t size;
    int32_t refs;
    int32_t factors[tw::kFftMaxStages];
    int32_t kinds[tw::kFftMaxStages];
    int32_t stageCount;
    FftStage* stages[tw::kFftMaxStages];
    tw::FftRealLeaf leafReal[tw::kFftMaxStages];
    tw::FftRealCombine combineReal[tw::kFftMaxStages];
    tw::FftComplexLeaf leafComplex[tw::kFftMaxStages];
    tw::FftComplexCombine combineComplex[tw::kFftMaxStages];
    FftTable* prev;
    FftTable* next;
};

namespace tw {

using ::FftStage;
using ::FftTable;

// The shared list. Create adds a reference (null for n < 1 or out of memory); destroy drops one.
FftTable* CreateFftTable(int32_t n);
void DestroyFftTable(FftTable* t);

// The factorisation of the table build: radices in ascending order with their kinds. Returns the
// stage count (0 for n = 1).
int32_t FftFactorise(int32_t n, int32_t* factors, int32_t* kinds);

// Smallest length >= n whose prime factors all have codelets; 0 if none fits in an i32.
int32_t FftNextFastSize(int32_t n);

Status FftRealForward(const FftTable* t, const double* in, double* out, ptrdiff_t inStride,
                      ptrdiff_t outStride, int32_t n);
// Scales and rewrites `in` (half-complex) on the way.
Status FftRealInverse(const FftTable* t, double* in, double* out, ptrdiff_t inStride, ptrdiff_t outStride,
                      int32_t n);
Status FftComplexForward(const FftTable* t, const double* inRe, const double* inIm, double* outRe,
                         double* outIm, ptrdiff_t inStride, ptrdiff_t outStride, int32_t n);
Status FftComplexInverse(const FftTable* t, const double* inRe, const double* inIm, double* outRe,
                         double* outIm, ptrdiff_t inStride, ptrdiff_t outStride, int32_t n);

// The spectrum of a half-complex sequence h of length n, in the usual order (shift 0) or centred
// with X[0] at n/2. h may be the upper half of out's lanes, reinterpret_cast<double*>(out) + n.
void FftUnpackHalfComplex(const double* h, int32_t n, int32_t shift, std::complex<double>* out);
// The reverse: reads only the non-negative frequencies of a spectrum in either order.
void FftPackHalfComplex(const std::complex<double>* in, int32_t n, int32_t shift, double* out);

}  // namespace tw
