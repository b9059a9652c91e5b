#include <type_traits>

#include "frame/frame.hpp"
#include "transform/fft/cached_tables.hpp"
#include "transform/fft2d.hpp"
#include "twanlys/fft.h"

namespace {

using tw::cdouble;
using tw::Frame;
using tw::Handle;
using tw::Status;

// The row table (length cols) sits in the first cell or slot 0, the column table (length rows) in
// the second cell or slot 1.
template <class T, bool InstanceData>
Status Forward(Handle x, int32_t rowStart, int32_t colStart, int32_t rows, int32_t cols, int32_t shift,
               Handle& y, void** cell0, void** cell1) {
    Frame f(tw::FailOn::NonZero);
    f.Output2D<cdouble>(y);
    const tw::Shape d = tw::Dims(x);
    Status s = d.rows < 1 || d.cols < 1                   ? EmptyArrayErr
               : rowStart >= d.rows || colStart >= d.cols ? IndexRangeErr
               : rows < 1 || cols < 1                     ? SizeMismatchErr
                                                          : 0;
    tw::CachedTables tables(cell0, InstanceData ? cell0 : cell1, InstanceData);
    tw::FftTable *rowTable = nullptr, *colTable = nullptr;
    if (s == 0) s = tables.Acquire(0, cols, &rowTable);
    if (s == 0) s = tables.Acquire(1, rows, &colTable);
    cdouble* out = nullptr;
    if (s == 0) s = f.Resize2D(y, rows, cols, &out);
    const T* xs = nullptr;
    if (s == 0) s = f.In2D(x, &xs);
    const tw::Fft2DWindow w{d.rows, d.cols, rowStart, colStart, rows, cols};
    if (s == 0) {
        if constexpr (std::is_same_v<T, double>)
            s = tw::Fft2DRealForward(rowTable, colTable, xs, w, shift, out);
        else
            s = tw::Fft2DComplexForward(rowTable, colTable, xs, w, shift, out);
    }
    return f.Finish(s);
}

template <class T, bool InstanceData>
Status Inverse(Handle x, int32_t shift, Handle& y, void** cell0, void** cell1) {
    Frame f(tw::FailOn::NonZero);
    f.Output2D<T>(y);
    const tw::Shape d = tw::Dims(x);
    Status s = d.rows < 1 || d.cols < 1 ? EmptyArrayErr : 0;
    tw::CachedTables tables(cell0, InstanceData ? cell0 : cell1, InstanceData);
    tw::FftTable *rowTable = nullptr, *colTable = nullptr;
    if (s == 0) s = tables.Acquire(0, d.cols, &rowTable);
    if (s == 0) s = tables.Acquire(1, d.rows, &colTable);
    T* out = nullptr;
    if (s == 0) s = f.Resize2D(y, d.rows, d.cols, &out);
    const cdouble* xs = nullptr;
    if (s == 0) s = f.In2D(x, &xs);
    if (s == 0) {
        if constexpr (std::is_same_v<T, double>)
            s = tw::Fft2DRealInverse(rowTable, colTable, xs, d.rows, d.cols, shift, out);
        else
            s = tw::Fft2DComplexInverse(rowTable, colTable, xs, d.rows, d.cols, shift, out);
    }
    return f.Finish(s);
}

}  // namespace

TW_API int32_t ReFFT2D_H(Array2DHandle x, int32_t rowStart, int32_t colStart, int32_t rows, int32_t cols,
                         int32_t shift, Array2DHandle y, void** rowCell, void** colCell) {
    return Forward<double, false>(x, rowStart, colStart, rows, cols, shift, y, rowCell, colCell);
}

TW_API int32_t CxFFT2D_H(Array2DHandle x, int32_t rowStart, int32_t colStart, int32_t rows, int32_t cols,
                         int32_t shift, Array2DHandle y, void** rowCell, void** colCell) {
    return Forward<cdouble, false>(x, rowStart, colStart, rows, cols, shift, y, rowCell, colCell);
}

TW_API int32_t ReInvFFT2D_H(Array2DHandle x, int32_t shift, Array2DHandle y, void** rowCell, void** colCell) {
    return Inverse<double, false>(x, shift, y, rowCell, colCell);
}

TW_API int32_t CxInvFFT2D_H(Array2DHandle x, int32_t shift, Array2DHandle y, void** rowCell, void** colCell) {
    return Inverse<cdouble, false>(x, shift, y, rowCell, colCell);
}

TW_API int32_t ReFFT2D_H_IDP(Array2DHandle x, int32_t rowStart, int32_t colStart, int32_t rows, int32_t cols,
                             int32_t shift, Array2DHandle y, void** cell) {
    return Forward<double, true>(x, rowStart, colStart, rows, cols, shift, y, cell, nullptr);
}

TW_API int32_t CxFFT2D_H_IDP(Array2DHandle x, int32_t rowStart, int32_t colStart, int32_t rows, int32_t cols,
                             int32_t shift, Array2DHandle y, void** cell) {
    return Forward<cdouble, true>(x, rowStart, colStart, rows, cols, shift, y, cell, nullptr);
}

TW_API int32_t ReInvFFT2D_H_IDP(Array2DHandle x, int32_t shift, Array2DHandle y, void** cell) {
    return Inverse<double, true>(x, shift, y, cell, nullptr);
}

TW_API int32_t CxInvFFT2D_H_IDP(Array2DHandle x, int32_t shift, Array2DHandle y, void** cell) {
    return Inverse<cdouble, true>(x, shift, y, cell, nullptr);
}
