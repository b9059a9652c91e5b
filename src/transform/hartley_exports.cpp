#include "frame/frame.hpp"
#include "transform/fft/cached_tables.hpp"
#include "transform/hartley.hpp"
#include "twanlys/transforms.h"

namespace {

using tw::Frame;
using tw::Handle;
using tw::Status;

enum class Kind { Hartley, InvHartley, Hilbert, InvHilbert };

template <Kind K, bool InstanceData>
Status InPlace(Handle& x, void** cell) {
    Frame f;
    const int32_t n = tw::Count(x);
    if (n < 1) {
        f.Output<double>(x);
        return f.Finish(EmptyArrayErr);
    }
    tw::CachedTables tables(cell, InstanceData);
    tw::FftTable* table = nullptr;
    Status s = tables.Acquire(0, n, &table);
    // The inverse Hartley export hands a failed table step back with x left as it was.
    if (s != 0 && K == Kind::InvHartley) return s;
    f.Output<double>(x);
    double* xs = nullptr;
    if (s == 0) s = f.InPlace(x, &xs);
    if (s == 0) {
        if constexpr (K == Kind::Hartley || K == Kind::InvHartley)
            s = tw::HartleyTransform(table, xs, n, K == Kind::InvHartley);
        else
            s = tw::HilbertTransform(table, xs, n, K == Kind::InvHilbert);
    }
    return f.Finish(s);
}

}  // namespace

TW_API int32_t FHTH(Array1DHandle x, void** cell) { return InPlace<Kind::Hartley, false>(x, cell); }

TW_API int32_t FHTH_IDP(Array1DHandle x, void** cell) { return InPlace<Kind::Hartley, true>(x, cell); }

TW_API int32_t InvFHTH(Array1DHandle x, void** cell) { return InPlace<Kind::InvHartley, false>(x, cell); }

TW_API int32_t InvFHTH_IDP(Array1DHandle x, void** cell) { return InPlace<Kind::InvHartley, true>(x, cell); }

TW_API int32_t FastHilbertTransformH(Array1DHandle x, void** cell) {
    return InPlace<Kind::Hilbert, false>(x, cell);
}

TW_API int32_t FastHilbertTransformH_IDP(Array1DHandle x, void** cell) {
    return InPlace<Kind::Hilbert, true>(x, cell);
}

TW_API int32_t InvFastHilbertTransformH(Array1DHandle x, void** cell) {
    return InPlace<Kind::InvHilbert, false>(x, cell);
}

TW_API int32_t InvFastHilbertTransformH_IDP(Array1DHandle x, void** cell) {
    return InPlace<Kind::InvHilbert, true>(x, cell);
}
