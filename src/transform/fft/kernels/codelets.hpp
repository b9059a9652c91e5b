// Kernel tables of the codelet radices, indexed by radix (slots 2 to 43; the others are null).
#pragma once

#include "transform/fft/fft.hpp"

namespace tw::fft {

struct CodeletTables {
    FftRealLeaf leafReal[kFftMaxRadix + 1];
    FftRealCombine combineReal[kFftMaxRadix + 1];
    FftComplexLeaf leafComplex[kFftMaxRadix + 1];
    FftComplexCombine combineComplex[kFftMaxRadix + 1];
};

// The tables for this processor, chosen once.
const CodeletTables& Codelets();

bool HasCodelet(int32_t radix);

}  // namespace tw::fft
