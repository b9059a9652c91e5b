// The library's inverse transforms for the Dolph-Chebyshev window. They run on the shared FFT
// tables; until those are part of the library the window reports an unsupported case.
#include "window/dolph_chebyshev.hpp"

namespace tw {
namespace {

Status InverseRealUnavailable(double*, int32_t, double*) { return InternalErr; }
Status InverseCosineUnavailable(double*, int32_t, double*) { return InternalErr; }

}  // namespace

const ChebyshevTransforms kChebyshevTransforms = {InverseRealUnavailable, InverseCosineUnavailable};

}  // namespace tw
