// Baseline kernels of the radices in group B.
#include "transform/fft/kernels/codelet_forms.hpp"

namespace tw::fft::sse2 {

void PutCodeletsB(CodeletTables& t) { CodeletForms<Sse2Lanes>::Put(t, CodeletGroupB{}); }

}  // namespace tw::fft::sse2
