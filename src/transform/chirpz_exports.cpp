#include <cstring>

#include "frame/frame.hpp"
#include "transform/chirpz.hpp"
#include "twanlys/transforms.h"

namespace {

using tw::cdouble;
using tw::Frame;
using tw::Handle;
using tw::Status;

// The host passes its complex scalars by pointer, with no promise of alignment; a missing one
// reads as NaN and fails the screen of the core.
cdouble Scalar(const ComplexDouble* p) {
    double v[2] = {tw::kNaN, tw::kNaN};
    if (p != nullptr) std::memcpy(v, p, sizeof v);
    return {v[0], v[1]};
}

template <class T>
Status Forward(Handle x, const ComplexDouble* A, const ComplexDouble* W, int32_t m, int32_t method, Handle& y) {
    Frame f;
    f.Output<cdouble>(y);
    const int32_t n = tw::Count(x);
    if (n < 1) return f.Finish(EmptyArrayErr);
    if (static_cast<uint32_t>(method) > 1) return f.Finish(InvalidSelectorErr);
    if (m < 1) m = n;
    cdouble* out = nullptr;
    Status s = f.Resize(y, m, &out) == 0 ? 0 : OutOfMemoryErr;
    const T* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = tw::ChirpZ(xs, n, Scalar(A), Scalar(W), m, method, out);
    return f.Finish(s);
}

}  // namespace

TW_API int32_t ChirpZT_head(Array1DHandle x, const ComplexDouble* A, const ComplexDouble* W, int32_t m,
                            int32_t method, Array1DHandle y) {
    return Forward<double>(x, A, W, m, method, y);
}

TW_API int32_t CxChirpZT_head(Array1DHandle x, const ComplexDouble* A, const ComplexDouble* W, int32_t m,
                              int32_t method, Array1DHandle y) {
    return Forward<cdouble>(x, A, W, m, method, y);
}

TW_API int32_t InvChirpZT_head(Array1DHandle x, const ComplexDouble* A, const ComplexDouble* W, int32_t m,
                               Array1DHandle y) {
    Frame f;
    f.Output<cdouble>(y);
    const int32_t n = tw::Count(x);
    if (m < 1) m = n;
    if (n < 1) return f.Finish(EmptyArrayErr);
    if (m > n) return f.Finish(SizeMismatchErr);
    cdouble* out = nullptr;
    Status s = f.Resize(y, m, &out) == 0 ? 0 : OutOfMemoryErr;
    const cdouble* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = tw::InverseChirpZ(xs, n, Scalar(A), Scalar(W), m, out);
    return f.Finish(s);
}
