#include <type_traits>

#include "frame/frame.hpp"
#include "transform/fft/cached_tables.hpp"
#include "transform/spectrum.hpp"
#include "twanlys/transforms.h"

namespace {

using tw::cdouble;
using tw::FftTable;
using tw::Frame;
using tw::Handle;
using tw::Status;

// The complex members report any failed resize as OutOfMemoryErr; CrossSpectrumH hands on the
// host's own status.
Status AsOutOfMemory(Status s) { return s == 0 ? 0 : OutOfMemoryErr; }

// A real record is replaced by its spectrum (y is x); a complex one gives it in y.
template <class T, bool InstanceData>
Status Power(Handle x, Handle& y, void** cell) {
    Frame f;
    f.Output<double>(y);
    const int32_t n = tw::Count(x);
    Status s = n < 1 ? EmptyArrayErr : 0;
    tw::CachedTables tables(cell, InstanceData);
    FftTable* table = nullptr;
    if (s == 0) s = tables.Acquire(0, n, &table);
    if constexpr (std::is_same_v<T, double>) {
        double* xs = nullptr;
        if (s == 0) s = f.InPlace(y, &xs);
        if (s == 0) s = tw::PowerSpectrum(table, xs, n);
    } else {
        double* out = nullptr;
        if (s == 0) s = AsOutOfMemory(f.Resize(y, n, &out));
        const cdouble* xs = nullptr;
        if (s == 0) s = f.In(x, &xs);
        if (s == 0) s = tw::PowerSpectrum(table, xs, out, n);
    }
    return f.Finish(s);
}

// z is resized before the table is acquired.
template <class T, bool InstanceData>
Status Cross(Handle x, Handle y, Handle& z, void** cell) {
    constexpr bool kComplex = std::is_same_v<T, cdouble>;
    Frame f;
    f.Output<cdouble>(z);
    const int32_t n = tw::Count(x);
    Status s = n < 1 || tw::Count(y) < 1 ? EmptyArrayErr : n != tw::Count(y) ? EqSamplesErr : 0;
    cdouble* out = nullptr;
    if (s == 0) {
        s = f.Resize(z, n, &out);
        if (kComplex) s = AsOutOfMemory(s);
    }
    tw::CachedTables tables(cell, InstanceData);
    FftTable* table = nullptr;
    if (s == 0) s = tables.Acquire(0, n, &table);
    const T *xs = nullptr, *ys = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = f.In(y, &ys);
    if (s == 0) s = tw::CrossSpectrum(table, xs, ys, out, n);
    return f.Finish(s);
}

}  // namespace

TW_API int32_t SpectrumH(Array1DHandle x, void** cell) { return Power<double, false>(x, x, cell); }

TW_API int32_t SpectrumH_IDP(Array1DHandle x, void** cell) { return Power<double, true>(x, x, cell); }

TW_API int32_t CxSpectrumH(Array1DHandle x, Array1DHandle y, void** cell) {
    return Power<cdouble, false>(x, y, cell);
}

TW_API int32_t CxSpectrumH_IDP(Array1DHandle x, Array1DHandle y, void** cell) {
    return Power<cdouble, true>(x, y, cell);
}

TW_API int32_t CrossSpectrumH(Array1DHandle x, Array1DHandle y, Array1DHandle z, void** cell) {
    return Cross<double, false>(x, y, z, cell);
}

TW_API int32_t CrossSpectrumH_IDP(Array1DHandle x, Array1DHandle y, Array1DHandle z, void** cell) {
    return Cross<double, true>(x, y, z, cell);
}

TW_API int32_t CxCrossSpectrumH(Array1DHandle x, Array1DHandle y, Array1DHandle z, void** cell) {
    return Cross<cdouble, false>(x, y, z, cell);
}

TW_API int32_t CxCrossSpectrumH_IDP(Array1DHandle x, Array1DHandle y, Array1DHandle z, void** cell) {
    return Cross<cdouble, true>(x, y, z, cell);
}
