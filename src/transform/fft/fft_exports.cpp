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
    // One block for the half-complex result (transformed at unit stride, where the kernels are
    // fastest, then unpacked into y) and, when the window reaches past x, the zero-padded input.
    const bool pad = size > count - start;
    tw::Scratch<double> work;
    if (s == 0) s = work.Allocate(static_cast<size_t>(size) * (pad ? 2 : 1));
    const double* source = xs + (s == 0 ? start : 0);
    if (s == 0 && pad) {
        CopyWindow(xs, count, start, size, work.get() + size);
        source = work.get() + size;
    }
    if (s == 0) s = tw::FftRealForward(table, source, work.get(), 1, 1, size);
    if (s == 0) tw::FftUnpackHalfComplex(work.get(), size, shift, out);
    return f.Finish(tw::MergeRelease(s, work.Release()));
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

template <bool InstanceData>
Status ComplexInverse(Handle x, Handle& y, void** cell, int32_t shift) {
    Frame f(tw::FailOn::NonZero);
    f.Output<cdouble>(y);
    const int32_t count = tw::Count(x);
    Status s = count < 1 ? EmptyArrayErr : 0;
    tw::CachedTables tables(cell, InstanceData);
    tw::FftTable* table = nullptr;
    if (s == 0) s = tables.Acquire(0, count, &table);
    cdouble* out = nullptr;
    if (s == 0) s = f.Resize(y, count, &out);
    const cdouble* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    tw::Scratch<cdouble> unrotated;
    const cdouble* source = xs;
    if (s == 0 && shift != 0) {
        s = unrotated.Allocate(static_cast<size_t>(count));
        if (s == 0) std::rotate_copy(xs, xs + count / 2, xs + count, unrotated.get());
        source = unrotated.get();
    }
    if (s == 0)
        s = tw::FftComplexInverse(table, Lanes(source), Lanes(source) + 1, Lanes(out), Lanes(out) + 1, 2, 2, count);
    return f.Finish(tw::MergeRelease(s, unrotated.Release()));
}

// The real-output inverses and the packed exports shrink their f64 output with the complex type
// code on failure; the block is emptied all the same.
template <bool InstanceData>
Status RealInverse(Handle x, Handle& y, void** cell, int32_t shift) {
    Frame f(tw::FailOn::NonZero);
    f.Output<cdouble>(y);
    const int32_t count = tw::Count(x);
    Status s = count < 1 ? EmptyArrayErr : 0;
    tw::CachedTables tables(cell, InstanceData);
    tw::FftTable* table = nullptr;
    if (s == 0) s = tables.Acquire(0, count, &table);
    tw::Scratch<double> packed;
    if (s == 0) s = packed.Allocate(static_cast<size_t>(count));
    double* out = nullptr;
    if (s == 0) s = f.Resize(y, count, &out);
    const cdouble* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) {
        tw::FftPackHalfComplex(xs, count, shift, packed.get());
        s = tw::FftRealInverse(table, packed.get(), out, 1, 1, count);
    }
    return f.Finish(tw::MergeRelease(s, packed.Release()));
}

template <bool InstanceData>
Status PackedForward(Handle x, Handle& y, void** cell) {
    Frame f(tw::FailOn::NonZero);
    f.Output<cdouble>(y);
    const int32_t count = tw::Count(x);
    Status s = count < 1 ? EmptyArrayErr : 0;
    double* out = nullptr;
    if (s == 0) s = f.Resize(y, count, &out);
    tw::CachedTables tables(cell, InstanceData);
    tw::FftTable* table = nullptr;
    if (s == 0) s = tables.Acquire(0, count, &table);
    const double* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = tw::FftRealForward(table, xs, out, 1, 1, count);
    return f.Finish(s);
}

template <bool InstanceData>
Status PackedInverse(Handle& x, Handle& y, void** cell) {
    Frame f(tw::FailOn::NonZero);
    f.Output<double>(x);
    f.Output<cdouble>(y);
    const int32_t count = tw::Count(x);
    Status s = count < 1 ? EmptyArrayErr : 0;
    double* out = nullptr;
    if (s == 0) s = f.Resize(y, count, &out);
    tw::CachedTables tables(cell, InstanceData);
    tw::FftTable* table = nullptr;
    if (s == 0) s = tables.Acquire(0, count, &table);
    double* xs = nullptr;
    if (s == 0) s = f.InPlace(x, &xs);
    if (s == 0) s = tw::FftRealInverse(table, xs, out, 1, 1, count);
    return f.Finish(s);
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
