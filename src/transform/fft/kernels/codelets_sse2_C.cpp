// Baseline kernels of the radices in group C.
#include "transform/fft/kernels/codelet_forms.hpp"

namespace tw::fft::sse2 {

void PutCodeletsC(CodeletTables& t) { CodeletForms<Sse2Lanes>::Put(t, CodeletGroupC{}); }

}  // namespace tw::fft::sse2
