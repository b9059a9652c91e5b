#include <utility>

#include "transform/fft/kernels/codelet_forms.hpp"

namespace tw::fft {

const CodeletTables& Codelets() {
    static const CodeletTables tables = CodeletForms<Sse2Lanes>::Make();
    return tables;
}

bool HasCodelet(int32_t radix) {
    return radix >= 2 && radix <= kFftMaxRadix && Codelets().leafReal[radix] != nullptr;
}

}  // namespace tw::fft
