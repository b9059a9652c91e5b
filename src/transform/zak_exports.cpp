#include "frame/frame.hpp"
#include "transform/fft/cached_tables.hpp"
#include "transform/zak.hpp"
#include "twanlys/transforms.h"

namespace {

using tw::cdouble;
using tw::Frame;
using tw::Handle;
using tw::Status;

template <class T, bool InstanceData>
Status Zak(Handle& x, int32_t M, int32_t N, int32_t offset, int32_t outLength, Handle& y, void** cell) {
    Frame f;
    f.Output<cdouble>(y);
    if (M < 1) return f.Finish(OrderNotPositiveErr);
    if (N < 1 || outLength < 1) return f.Finish(FftSizeErr);
    const int32_t n = tw::Count(x);
    cdouble* out = nullptr;
    if (n < 1) return f.Finish(f.Resize(y, 0, &out));
    tw::CachedTables tables(cell, InstanceData);
    tw::FftTable* table = nullptr;
    Status s = tables.Acquire(0, N, &table);
    if (s == 0) s = f.Resize(y, outLength, &out);
    // x is folded in place and keeps its fold whatever becomes of y: a frame of its own commits it.
    Frame xf;
    T* xs = nullptr;
    if (s == 0) s = xf.InPlace(x, &xs);
    if (s == 0) s = tw::ZakTransform(table, xs, n, M, N, offset, out, outLength);
    const Status written = xf.Finish(0);
    return f.Finish(s != 0 ? s : written);
}

}  // namespace

TW_API int32_t ReDZTH(Array1DHandle x, int32_t M, int32_t N, int32_t offset, int32_t outLength,
                      Array1DHandle y, void** cell) {
    return Zak<double, false>(x, M, N, offset, outLength, y, cell);
}

TW_API int32_t ReDZTH_IDP(Array1DHandle x, int32_t M, int32_t N, int32_t offset, int32_t outLength,
                          Array1DHandle y, void** cell) {
    return Zak<double, true>(x, M, N, offset, outLength, y, cell);
}

TW_API int32_t CxDZTH(Array1DHandle x, int32_t M, int32_t N, int32_t offset, int32_t outLength,
                      Array1DHandle y, void** cell) {
    return Zak<cdouble, false>(x, M, N, offset, outLength, y, cell);
}

TW_API int32_t CxDZTH_IDP(Array1DHandle x, int32_t M, int32_t N, int32_t offset, int32_t outLength,
                          Array1DHandle y, void** cell) {
    return Zak<cdouble, true>(x, M, N, offset, outLength, y, cell);
}
