// AVX2 kernels of the radices in group C; used only where the processor has AVX2 (codelets.cpp).
// What the kernels share with the rest of the library is included before the target switch, and
// the kernel headers go into their own namespace.
#include <immintrin.h>

#include <cstddef>
#include <cstdint>
#include <utility>

#include "frame/memory.hpp"
#include "transform/fft/kernels/codelets.hpp"

#pragma GCC push_options
#pragma GCC target("avx2")
#define TW_FFT_ISA avx2
#include "transform/fft/kernels/codelet_forms.hpp"
#include "transform/fft/kernels/lanes_avx2.hpp"

namespace tw::fft::avx2 {

void PutCodeletsC(CodeletTables& t) { CodeletForms<Avx2Lanes>::Put(t, CodeletGroupC{}); }

}  // namespace tw::fft::avx2
#pragma GCC pop_options
