#include <algorithm>
#include <cstring>

#include "frame/frame.hpp"
#include "transform/fft/fft.hpp"
#include "transform/fft/cached_tables.hpp"
#include "twanlys/fft.h"

namespace {

using tw::cdouble;
using tw::Frame;
using tw::Handle;
using tw::Status;

double* Lanes(cdouble* p) { return reinterpret_cast<double*>(p); }
const double* Lanes(const cdouble* p) { return reinterpret_cast<const double*>(p); }

// x[start .. start+size) of a sequence that is zero outside its count elements.
template <class T>
void CopyWindow(const T* x, int32_t count, int32_t start, int32_t size, T* out) {
    for (int32_t i = 0; i < size; ++i) {
        const int64_t j = static_cast<int64_t>(start) + i;
        out[i] = (j >= 0 && j < count) ? x[j] : T{};
    }
}

template <bool InstanceData>
Status RealForward(Handle x, Handle& y, void** cell, int32_t start, int32_t size, int32_t shift) {
    Frame f(tw::FailOn::NonZero);
    f.Output<cdouble>(y);
    const int32_t count = tw::Count(x);
    Status s = count < 1                        ? EmptyArrayErr
               : (start < 0 || start >= count) ? IndexRangeErr
               : size < 1                       ? FftSizeErr
                                                : 0;
    tw::CachedTables tables(cell, InstanceData);
    tw::FftTable* table = nullptr;
    if (s == 0) s = tables.Acquire(0, size, &table);
    cdouble* out = nullptr;
    if (s == 0) s = f.Resize(y, size, &out);
    const double* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s != 0) return f.Finish(s);
    // No scratch: the half-complex result goes to the upper half of y's lanes, at unit stride
    // where the kernels are fastest, and is unpacked from there in place. A window reaching past
    // x is zero-padded into the lower half, which the transform leaves alone.
    double* lanes = Lanes(out);
    const double* source = xs + start;
    if (size > count - start) {
        CopyWindow(xs, count, start, size, lanes);
        source = lanes;
    }
    s = tw::FftRealForward(table, source, lanes + size, 1, 1, size);
    if (s == 0) tw::FftUnpackHalfComplex(lanes + size, size, shift, out);
    return f.Finish(s);
}

template <bool InstanceData>
Status ComplexForward(Handle x, Handle& y, void** cell, int32_t start, int32_t size, int32_t shift) {
    Frame f(tw::FailOn::NonZero);
    f.Output<cdouble>(y);
    const int32_t count = tw::Count(x);
    Status s = count < 1 ? EmptyArrayErr : size < 1 ? FftSizeErr : 0;
    tw::CachedTables tables(cell, InstanceData);
    tw::FftTable* table = nullptr;
    if (s == 0) s = tables.Acquire(0, size, &table);
    const cdouble* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    // start is not validated here; a window reaching outside x reads zeros there.
    tw::Scratch<cdouble> padded;
    const cdouble* source = nullptr;
    if (s == 0) {
        if (start < 0 || size > count - start) {
            s = padded.Allocate(static_cast<size_t>(size));
            if (s == 0) CopyWindow(xs, count, start, size, padded.get());
            source = padded.get();
        } else {
            source = xs + start;
        }
    }
    cdouble* out = nullptr;
    if (s == 0) s = f.Resize(y, size, &out);
    if (s == 0) s = tw::FftComplexForward(table, Lanes(source), Lanes(source) + 1, Lanes(out), Lanes(out) + 1, 2, 2, size);
    // Centred order: the upper size/2 elements go to the front, which puts DC at size/2 for both
    // parities (the same order as the real export's unpack). The inverse undoes exactly this.
    if (s == 0 && shift != 0) std::rotate(out, out + (size - size / 2), out + size);
    return f.Finish(tw::MergeRelease(s, padded.Release()));
}

// The opening of the exports that transform the whole of x: x must not be empty, the table of
// its length comes from the cell, and y is resized to as many elements. Its frame fails on any
// non-zero status; y shrinks with its own type code.
struct WholeLength {
    Frame f{tw::FailOn::NonZero};
    tw::CachedTables tables;
    tw::FftTable* table = nullptr;
    const int32_t count;
    Status s;

    template <class Out>
    WholeLength(Handle x, Handle& y, void** cell, bool instanceData, Out** out)
        : tables(cell, instanceData), count(tw::Count(x)) {
        f.Output<Out>(y);
        s = count < 1 ? EmptyArrayErr : 0;
        if (s == 0) s = tables.Acquire(0, count, &table);
        if (s == 0) s = f.Resize(y, count, out);
    }
};

template <bool InstanceData>
Status ComplexInverse(Handle x, Handle& y, void** cell, int32_t shift) {
    cdouble* out = nullptr;
    WholeLength w(x, y, cell, InstanceData, &out);
    const cdouble* xs = nullptr;
    Status s = w.s;
    if (s == 0) s = w.f.In(x, &xs);
    tw::Scratch<cdouble> unrotated;
    const cdouble* source = xs;
    if (s == 0 && shift != 0) {
        s = unrotated.Allocate(static_cast<size_t>(w.count));
        if (s == 0) std::rotate_copy(xs, xs + w.count / 2, xs + w.count, unrotated.get());
        source = unrotated.get();
    }
    if (s == 0)
        s = tw::FftComplexInverse(w.table, Lanes(source), Lanes(source) + 1, Lanes(out), Lanes(out) + 1, 2, 2, w.count);
    return w.f.Finish(tw::MergeRelease(s, unrotated.Release()));
}

template <bool InstanceData>
Status RealInverse(Handle x, Handle& y, void** cell, int32_t shift) {
    double* out = nullptr;
    WholeLength w(x, y, cell, InstanceData, &out);
    tw::Scratch<double> packed;
    Status s = w.s;
    if (s == 0) s = packed.Allocate(static_cast<size_t>(w.count));
    const cdouble* xs = nullptr;
    if (s == 0) s = w.f.In(x, &xs);
    if (s == 0) {
        tw::FftPackHalfComplex(xs, w.count, shift, packed.get());
        s = tw::FftRealInverse(w.table, packed.get(), out, 1, 1, w.count);
    }
    return w.f.Finish(tw::MergeRelease(s, packed.Release()));
}

template <bool InstanceData>
Status PackedForward(Handle x, Handle& y, void** cell) {
    double* out = nullptr;
    WholeLength w(x, y, cell, InstanceData, &out);
    const double* xs = nullptr;
    Status s = w.s;
    if (s == 0) s = w.f.In(x, &xs);
    if (s == 0) s = tw::FftRealForward(w.table, xs, out, 1, 1, w.count);
    return w.f.Finish(s);
}

// x is worked on in place, so it is an output too.
template <bool InstanceData>
Status PackedInverse(Handle& x, Handle& y, void** cell) {
    double* out = nullptr;
    WholeLength w(x, y, cell, InstanceData, &out);
    w.f.Output<double>(x);
    double* xs = nullptr;
    Status s = w.s;
    if (s == 0) s = w.f.InPlace(x, &xs);
    if (s == 0) s = tw::FftRealInverse(w.table, xs, out, 1, 1, w.count);
    return w.f.Finish(s);
}

}  // namespace

TW_API FftTable* create_qxfft_table(int32_t n) { return tw::CreateFftTable(n); }

TW_API void destroy_qxfft_table(FftTable* table) { tw::DestroyFftTable(table); }

TW_API int32_t ReQXFFTH80(Array1DHandle x, Array1DHandle y, void** cell, int32_t start, int32_t size,
                          int32_t shift) {
    return RealForward<false>(x, y, cell, start, size, shift);
}

TW_API int32_t ReQXFFTH(Array1DHandle x, Array1DHandle y, void** cell) {
    return RealForward<false>(x, y, cell, 0, tw::Count(x), 0);
}

TW_API int32_t ReQXFFTH80_IDP(Array1DHandle x, Array1DHandle y, void** cell, int32_t start,
                              int32_t size, int32_t shift) {
    return RealForward<true>(x, y, cell, start, size, shift);
}

TW_API int32_t ReQXFFTHCH(Array1DHandle x, Array1DHandle y, void** cell) { return PackedForward<false>(x, y, cell); }

TW_API int32_t ReQXFFTHCH_IDP(Array1DHandle x, Array1DHandle y, void** cell) {
    return PackedForward<true>(x, y, cell);
}

TW_API int32_t InvReQXFFTH80(Array1DHandle x, Array1DHandle y, void** cell, int32_t shift) {
    return RealInverse<false>(x, y, cell, shift);
}

TW_API int32_t InvReQXFFTH(Array1DHandle x, Array1DHandle y, void** cell) { return RealInverse<false>(x, y, cell, 0); }

TW_API int32_t InvReQXFFTH80_IDP(Array1DHandle x, Array1DHandle y, void** cell, int32_t shift) {
    return RealInverse<true>(x, y, cell, shift);
}

TW_API int32_t InvReQXFFTHCH(Array1DHandle x, Array1DHandle y, void** cell) {
    return PackedInverse<false>(x, y, cell);
}

TW_API int32_t InvReQXFFTHCH_IDP(Array1DHandle x, Array1DHandle y, void** cell) {
    return PackedInverse<true>(x, y, cell);
}

TW_API int32_t CxQXFFTH80(Array1DHandle x, Array1DHandle y, void** cell, int32_t start, int32_t size,
                          int32_t shift) {
    return ComplexForward<false>(x, y, cell, start, size, shift);
}

TW_API int32_t CxQXFFTH(Array1DHandle x, Array1DHandle y, void** cell) {
    return ComplexForward<false>(x, y, cell, 0, tw::Count(x), 0);
}

TW_API int32_t CxQXFFTH80_IDP(Array1DHandle x, Array1DHandle y, void** cell, int32_t start,
                              int32_t size, int32_t shift) {
    return ComplexForward<true>(x, y, cell, start, size, shift);
}

TW_API int32_t InvCxQXFFTH80(Array1DHandle x, Array1DHandle y, void** cell, int32_t shift) {
    return ComplexInverse<false>(x, y, cell, shift);
}

TW_API int32_t InvCxQXFFTH(Array1DHandle x, Array1DHandle y, void** cell) {
    return ComplexInverse<false>(x, y, cell, 0);
}

TW_API int32_t InvCxQXFFTH80_IDP(Array1DHandle x, Array1DHandle y, void** cell, int32_t shift) {
    return ComplexInverse<true>(x, y, cell, shift);
}
