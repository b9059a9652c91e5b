// AVX2 kernels of the radices in group A; used only where the processor has AVX2 (codelets.cpp).
#define TW_FFT_GROUP A
#include "transform/fft/kernels/codelets_avx2.inc"
