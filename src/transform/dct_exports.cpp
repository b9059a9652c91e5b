#include "frame/frame.hpp"
#include "transform/fft/cached_tables.hpp"
#include "transform/dct.hpp"
#include "twanlys/transforms.h"

namespace {

using tw::FftTable;
using tw::Frame;
using tw::Handle;
using tw::Status;
using tw::TrigKind;

template <TrigKind Kind, bool InstanceData>
Status Trig1D(Handle x, Handle& y, int32_t size, void** cell) {
    Frame f;
    f.Output<double>(y);
    const int32_t count = tw::Count(x);
    Status s = count < 1 ? EmptyArrayErr : 0;
    const int32_t n = size < 1 ? count : size;
    tw::CachedTables tables(cell, InstanceData);
    FftTable* table = nullptr;
    if (s == 0) s = tables.Acquire(0, tw::TrigTableLength(Kind, n), &table);
    double* out = nullptr;
    if (s == 0) s = f.Resize(y, n, &out);
    const double* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = tw::TrigTransform(Kind, table, xs, count, out, n);
    return f.Finish(s);
}

template <TrigKind Kind, bool InstanceData>
Status Trig2D(Handle x, Handle& y, int32_t rows, int32_t cols, void** rowCell, void** colCell) {
    Frame f;
    f.Output2D<double>(y);
    const tw::Shape d = tw::Dims(x);
    Status s = d.rows < 1 || d.cols < 1 ? EmptyArrayErr : 0;
    if (rows < 1) rows = d.rows;
    if (cols < 1) cols = d.cols;
    tw::CachedTables tables(rowCell, colCell, InstanceData);
    FftTable *rowTable = nullptr, *colTable = nullptr;
    if (s == 0) s = tables.Acquire(0, tw::TrigTableLength(Kind, cols), &rowTable);
    if (s == 0) s = tables.Acquire(1, tw::TrigTableLength(Kind, rows), &colTable);
    double* out = nullptr;
    if (s == 0) s = f.Resize2D(y, rows, cols, &out);
    const double* xs = nullptr;
    if (s == 0) s = f.In2D(x, &xs);
    if (s == 0) s = tw::TrigTransform2D(Kind, rowTable, colTable, xs, d.rows, d.cols, out, rows, cols);
    return f.Finish(s);
}

}  // namespace

TW_API int32_t DCT_1DH(Array1DHandle x, Array1DHandle y, int32_t size, void** cell) {
    return Trig1D<TrigKind::CosForward, false>(x, y, size, cell);
}

TW_API int32_t InvDCT_1DH(Array1DHandle x, Array1DHandle y, void** cell) {
    return Trig1D<TrigKind::CosInverse, false>(x, y, 0, cell);
}

TW_API int32_t DST_1DH(Array1DHandle x, Array1DHandle y, int32_t size, void** cell) {
    return Trig1D<TrigKind::SinForward, false>(x, y, size, cell);
}

TW_API int32_t InvDST_1DH(Array1DHandle x, Array1DHandle y, void** cell) {
    return Trig1D<TrigKind::SinInverse, false>(x, y, 0, cell);
}

TW_API int32_t DCT_2DH(Array2DHandle x, Array2DHandle y, int32_t rows, int32_t cols, void** rowCell,
                       void** colCell) {
    return Trig2D<TrigKind::CosForward, false>(x, y, rows, cols, rowCell, colCell);
}

TW_API int32_t InvDCT_2DH(Array2DHandle x, Array2DHandle y, void** rowCell, void** colCell) {
    return Trig2D<TrigKind::CosInverse, false>(x, y, 0, 0, rowCell, colCell);
}

TW_API int32_t DST_2DH(Array2DHandle x, Array2DHandle y, int32_t rows, int32_t cols, void** rowCell,
                       void** colCell) {
    return Trig2D<TrigKind::SinForward, false>(x, y, rows, cols, rowCell, colCell);
}

TW_API int32_t InvDST_2DH(Array2DHandle x, Array2DHandle y, void** rowCell, void** colCell) {
    return Trig2D<TrigKind::SinInverse, false>(x, y, 0, 0, rowCell, colCell);
}

TW_API int32_t DCT_1DH_IDP(Array1DHandle x, Array1DHandle y, int32_t size, void** cell) {
    return Trig1D<TrigKind::CosForward, true>(x, y, size, cell);
}

TW_API int32_t InvDCT_1DH_IDP(Array1DHandle x, Array1DHandle y, void** cell) {
    return Trig1D<TrigKind::CosInverse, true>(x, y, 0, cell);
}

TW_API int32_t DST_1DH_IDP(Array1DHandle x, Array1DHandle y, int32_t size, void** cell) {
    return Trig1D<TrigKind::SinForward, true>(x, y, size, cell);
}

TW_API int32_t InvDST_1DH_IDP(Array1DHandle x, Array1DHandle y, void** cell) {
    return Trig1D<TrigKind::SinInverse, true>(x, y, 0, cell);
}

TW_API int32_t DCT_2DH_IDP(Array2DHandle x, Array2DHandle y, int32_t rows, int32_t cols, void** cell) {
    return Trig2D<TrigKind::CosForward, true>(x, y, rows, cols, cell, cell);
}

TW_API int32_t InvDCT_2DH_IDP(Array2DHandle x, Array2DHandle y, void** cell) {
    return Trig2D<TrigKind::CosInverse, true>(x, y, 0, 0, cell, cell);
}

TW_API int32_t DST_2DH_IDP(Array2DHandle x, Array2DHandle y, int32_t rows, int32_t cols, void** cell) {
    return Trig2D<TrigKind::SinForward, true>(x, y, rows, cols, cell, cell);
}

TW_API int32_t InvDST_2DH_IDP(Array2DHandle x, Array2DHandle y, void** cell) {
    return Trig2D<TrigKind::SinInverse, true>(x, y, 0, 0, cell, cell);
}
