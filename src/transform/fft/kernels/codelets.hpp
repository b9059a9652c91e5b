// Kernel tables of the codelet radices, indexed by radix (slots 2 to 43; the others are null).
#pragma once

#include <utility>

#include "transform/fft/fft.hpp"

namespace tw::fft {

// The forms from a given sub-transform (leaves) or column (combines; real: column pair) on. Wider
// lanes hand the transforms their width does not divide to the baseline's narrower lanes.
using FftRealLeafFrom = void (*)(const double* in, double* out, ptrdiff_t inStride, ptrdiff_t outStride,
                                 int32_t count, int32_t from);
using FftRealCombineFrom = void (*)(double* data, const double* twRe, const double* twIm, ptrdiff_t stride,
                                    int32_t m, int32_t from);
using FftComplexLeafFrom = void (*)(const double* inRe, const double* inIm, double* outRe, double* outIm,
                                    ptrdiff_t inStride, ptrdiff_t outStride, int32_t count, int32_t from);
using FftComplexCombineFrom = void (*)(double* re, double* im, const double* twRe, const double* twIm,
                                       ptrdiff_t stride, int32_t m, int32_t from);

// Leaves side by side: `group` leaves, leaf g at in + g inLane and out + g outLane.
using FftRealLeafLanes = void (*)(const double* in, double* out, ptrdiff_t inStride, ptrdiff_t outStride,
                                  int32_t count, int32_t group, ptrdiff_t inLane, ptrdiff_t outLane);
using FftComplexLeafLanes = void (*)(const double* inRe, const double* inIm, double* outRe, double* outIm,
                                     ptrdiff_t inStride, ptrdiff_t outStride, int32_t count, int32_t group,
                                     ptrdiff_t inLane, ptrdiff_t outLane);
// Combines side by side: `group` combines, combine g at data + g lane (complex: re and im).
using FftRealCombineLanes = void (*)(double* data, const double* twRe, const double* twIm, ptrdiff_t stride,
                                     int32_t m, int32_t group, ptrdiff_t lane);
using FftComplexCombineLanes = void (*)(double* re, double* im, const double* twRe, const double* twIm,
                                        ptrdiff_t stride, int32_t m, int32_t group, ptrdiff_t lane);

struct CodeletTables {
    FftRealLeaf leafReal[kFftMaxRadix + 1];
    FftRealCombine combineReal[kFftMaxRadix + 1];
    FftComplexLeaf leafComplex[kFftMaxRadix + 1];
    FftComplexCombine combineComplex[kFftMaxRadix + 1];
    FftRealLeafFrom leafRealFrom[kFftMaxRadix + 1];
    FftRealCombineFrom combineRealFrom[kFftMaxRadix + 1];
    FftComplexLeafFrom leafComplexFrom[kFftMaxRadix + 1];
    FftComplexCombineFrom combineComplexFrom[kFftMaxRadix + 1];
    FftRealLeafLanes leafRealLanes[kFftMaxRadix + 1];
    FftComplexLeafLanes leafComplexLanes[kFftMaxRadix + 1];
    FftRealCombineLanes combineRealLanes[kFftMaxRadix + 1];
    FftComplexCombineLanes combineComplexLanes[kFftMaxRadix + 1];
};

// The narrower lanes of the widest vectors: the baseline tables' From entries.
struct BaselineRest {};

// The tables for this processor, chosen once.
const CodeletTables& Codelets();
// The baseline tables, present on every processor.
const CodeletTables& BaselineCodelets();

bool HasCodelet(int32_t radix);

// The tables of one instruction set; null where the processor lacks it.
enum class CodeletIsa { Sse2, Avx2 };
const CodeletTables* CodeletsFor(CodeletIsa isa);

// The radices in three groups of similar compile cost, one source file per group and
// instruction set.
using CodeletGroupA = std::integer_sequence<int, 2, 3, 4, 5, 7, 8, 9, 10, 11, 13, 14, 16, 17, 18, 19, 32>;
using CodeletGroupB = std::integer_sequence<int, 29, 31, 37>;
using CodeletGroupC = std::integer_sequence<int, 41, 43>;

namespace sse2 {
void PutCodeletsA(CodeletTables& t);
void PutCodeletsB(CodeletTables& t);
void PutCodeletsC(CodeletTables& t);
}  // namespace sse2
namespace avx2 {
void PutCodeletsA(CodeletTables& t);
void PutCodeletsB(CodeletTables& t);
void PutCodeletsC(CodeletTables& t);
}  // namespace avx2

}  // namespace tw::fft
