// Baseline kernels of the radices in group A.
#include "transform/fft/kernels/codelet_forms.hpp"

namespace tw::fft::sse2 {

void PutCodeletsA(CodeletTables& t) { CodeletForms<Sse2Lanes>::Put(t, CodeletGroupA{}); }

}  // namespace tw::fft::sse2
