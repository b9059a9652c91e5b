// Frames of the matrix exports: products, transposition, trace, norms, rank, condition.
#include <cstring>

#include "frame/frame.hpp"
#include "matrix/matrix_core.hpp"
#include "matrix/matrix_frame.hpp"
#include "twanlys/matrix.h"

using namespace tw;

namespace {

template <class T>
Status Transpose(Handle a, Handle& b, int32_t* host) {
    Frame f;
    f.Output2D<T>(b);
    const Shape d = Dims(a);
    const T* src = nullptr;
    T* dst = nullptr;
    Status s = (d.rows < 1 || d.cols < 1) ? EmptyArrayErr : f.In2D(a, &src);
    if (s == 0) s = Out2D(f, b, d.cols, d.rows, &dst, host);
    if (s == 0) s = TransposeMatrix<T>(const_cast<T*>(src), d.rows, d.cols, dst);
    return f.Finish(s);
}

template <class T>
Status Product(Handle a, Handle b, Handle& c, int32_t privateCopies, int32_t* host) {
    Frame f;
    f.Output2D<T>(c);
    const Shape da = Dims(a), db = Dims(b);
    const T *pa = nullptr, *pb = nullptr;
    T* pc = nullptr;
    Status s = da.cols != db.rows ? InnerDimensionErr : 0;
    if (s == 0 && (da.rows < 0 || da.cols < 0 || db.cols < 0)) s = NegativeSizeErr;
    if (s == 0) s = Out2D(f, c, da.rows, db.cols, &pc, host);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = f.In2D(b, &pb);
    if (s == 0) s = MatMul(pa, pb, da.rows, da.cols, db.cols, pc, privateCopies);
    return f.Finish(s);
}

template <class T>
Status MatrixVector(Handle a, Handle x, Handle& y, int32_t* host) {
    Frame f;
    f.Output<T>(y);
    const Shape d = Dims(a);
    const int32_t n = Count(x);
    Status s = (d.rows < 0 || d.cols < 0 || n < 0) ? NegativeSizeErr : 0;
    // The length test is made after the sign test and overrides it.
    if (d.cols != n) s = InnerDimensionErr;
    const T *pa = nullptr, *px = nullptr;
    T* py = nullptr;
    const bool empty = static_cast<int64_t>(d.rows) * d.cols == 0;
    if (s == 0) s = Out1D(f, y, empty ? 0 : d.rows, &py, host);
    if (s == 0 && !empty) {
        s = f.In2D(a, &pa);
        if (s == 0) s = f.In(x, &px);
        if (s == 0) AxVect(pa, d.rows, d.cols, px, py);
    }
    return f.Finish(s);
}

template <class T>
Status VectorMatrix(Handle x, Handle a, Handle& y, int32_t privateCopies) {
    Frame f;
    f.Output<T>(y);
    const Shape d = Dims(a);
    const int32_t n = Count(x);
    int32_t host = 0;
    Status s = (d.rows < 0 || d.cols < 0 || n < 0) ? NegativeSizeErr : d.rows != n ? InnerDimensionErr : 0;
    const T *pa = nullptr, *px = nullptr;
    T* py = nullptr;
    const bool empty = static_cast<int64_t>(d.rows) * d.cols == 0;
    if (s == 0) s = Out1D(f, y, empty ? 0 : d.cols, &py, &host);
    if (s == 0 && !empty) {
        s = f.In2D(a, &pa);
        if (s == 0) s = f.In(x, &px);
        if (s == 0) s = MatMul(px, pa, 1, d.rows, d.cols, py, privateCopies);
    }
    return f.Finish(s);
}

template <class T>
Status Dot(Handle x, Handle y, T* result) {
    Frame f;
    f.Result(reinterpret_cast<double*>(result), sizeof(T) / sizeof(double));
    const int32_t n = Count(x);
    const T *px = nullptr, *py = nullptr;
    Status s = n != Count(y) ? EqSamplesErr : n < 1 ? EmptyArrayErr : f.In(x, &px);
    if (s == 0) s = f.In(y, &py);
    if (s == 0) {
        // A plain sum of products: the complex form does not conjugate.
        T sum = 0;
        for (int32_t i = 0; i < n; ++i) sum += px[i] * py[i];
        std::memcpy(result, &sum, sizeof sum);
    }
    return f.Finish(s);
}

template <class T>
Status Outer(Handle x, Handle y, Handle& m, int32_t* host) {
    Frame f;
    f.Output2D<T>(m);
    const int32_t nx = Count(x), ny = Count(y);
    const T *px = nullptr, *py = nullptr;
    T* pm = nullptr;
    Status s = (nx < 1 || ny < 1) ? EmptyArrayErr : Out2D(f, m, nx, ny, &pm, host);
    if (s == 0) s = f.In(x, &px);
    if (s == 0) s = f.In(y, &py);
    if (s == 0)
        for (int32_t i = 0; i < nx; ++i)
            for (int32_t j = 0; j < ny; ++j) pm[static_cast<size_t>(i) * ny + j] = px[i] * py[j];
    return f.Finish(s);
}

template <class T>
Status Trace(Handle a, T* result) {
    Frame f;
    f.Result(reinterpret_cast<double*>(result), sizeof(T) / sizeof(double));
    const Shape d = Dims(a);
    const T* pa = nullptr;
    Status s = (d.rows < 1 || d.cols < 1) ? EmptyArrayErr : f.In2D(a, &pa);
    if (s == 0) {
        T sum = 0;
        for (int32_t i = 0; i < std::min(d.rows, d.cols); ++i) sum += pa[static_cast<size_t>(i) * d.cols + i];
        std::memcpy(result, &sum, sizeof sum);
    }
    return f.Finish(s);
}

// The frame of the reductions of one matrix to a scalar.
template <class T, class Core>
Status Reduce(Handle a, double* result, Core core) {
    Frame f;
    f.Result(result);
    const Shape d = Dims(a);
    const T* pa = nullptr;
    Status s = (d.rows < 1 || d.cols < 1) ? EmptyArrayErr : f.In2D(a, &pa);
    if (s == 0) s = core(pa, d.rows, d.cols);
    return f.Finish(s);
}

template <class T>
Status Norm(Handle a, MatrixNormType* type, double* result) {
    return Reduce<T>(a, result, [&](const T* p, int32_t m, int32_t n) { return MatrixNorm(p, m, n, *type, result); });
}

template <class T>
Status Cond(Handle a, int32_t* type, double* cond) {
    return Reduce<T>(a, cond, [&](const T* p, int32_t m, int32_t n) { return ConditionNumber(p, m, n, *type, cond); });
}

template <class T>
Status Rank(Handle a, double* tol, int32_t* rank) {
    double unused = 0;
    const Status s = Reduce<T>(a, &unused, [&](const T* p, int32_t m, int32_t n) { return MatrixRank(p, m, n, *tol, rank); });
    if (s < 0) *rank = -1;
    return s;
}

template <class T>
Status VecNorm(Handle x, double p, double* result) {
    Frame f;
    f.Result(result);
    const int32_t n = Count(x);
    const T* px = nullptr;
    Status s = n < 1 ? EmptyArrayErr : f.In(x, &px);
    if (s == 0) s = VectorNorm(const_cast<T*>(px), n, p, 0, result);
    return f.Finish(s);
}

template <class T>
Status InitialMatrix(int32_t rows, int32_t cols, Handle& m) {
    Frame f;
    f.Output2D<T>(m);
    int32_t host = 0;
    T* pm = nullptr;
    Status s = (rows < 1 || cols < 1) ? EmptyArrayErr : 0;
    if (s == 0) {
        void* trial = PlainAlloc(static_cast<size_t>(rows) * static_cast<size_t>(cols) * sizeof(T));
        if (trial == nullptr) s = OutOfMemoryErr;
        PlainFree(trial);
    }
    if (s == 0) s = Out2D(f, m, rows, cols, &pm, &host);
    if (s == 0) std::fill(pm, pm + static_cast<size_t>(rows) * cols, T(0));
    return f.Finish(s);
}

}  // namespace

TW_API int32_t Transpose_head(Array2DHandle a, Array2DHandle b) {
    int32_t host = 0;
    const Status s = Transpose<double>(a, b, &host);
    return host != 0 ? host : s;
}

TW_API int32_t CxTranspose_head(Array2DHandle a, Array2DHandle b, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Transpose<cdouble>(a, b, host); });
}

TW_API int32_t MatrixMulAligned_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t privateCopies,
                                     int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Product<double>(a, b, c, privateCopies, host); });
}

TW_API int32_t MatrixMul_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t* status) {
    return MatrixMulAligned_head(a, b, c, 0, status);
}

TW_API int32_t AxBCxAlignedCIN(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t privateCopies,
                               int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Product<cdouble>(a, b, c, privateCopies, host); });
}

TW_API int32_t AxBCxCIN(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t* status) {
    return AxBCxAlignedCIN(a, b, c, 0, status);
}

// privateCopies has no effect on the plain matrix-vector loop.
TW_API int32_t AxVectAligned_head(Array2DHandle a, Array1DHandle x, Array1DHandle y, int32_t,
                                  int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return MatrixVector<double>(a, x, y, host); });
}

TW_API int32_t AxVect_head(Array2DHandle a, Array1DHandle x, Array1DHandle y, int32_t* status) {
    return AxVectAligned_head(a, x, y, 0, status);
}

TW_API int32_t AxVectorCxAligned(Array2DHandle a, Array1DHandle x, Array1DHandle y, int32_t, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return MatrixVector<cdouble>(a, x, y, host); });
}

TW_API int32_t AxVectorCx(Array2DHandle a, Array1DHandle x, Array1DHandle y, int32_t* status) {
    return AxVectorCxAligned(a, x, y, 0, status);
}

TW_API int32_t vectxAAligned_head(Array1DHandle x, Array2DHandle a, Array1DHandle y, int32_t privateCopies) {
    return VectorMatrix<double>(x, a, y, privateCopies);
}

TW_API int32_t vectxA_head(Array1DHandle x, Array2DHandle a, Array1DHandle y) {
    return vectxAAligned_head(x, a, y, 0);
}

TW_API int32_t CxVectxAAligned_head(Array1DHandle x, Array2DHandle a, Array1DHandle y, int32_t privateCopies) {
    return VectorMatrix<cdouble>(x, a, y, privateCopies);
}

TW_API int32_t CxVectxA_head(Array1DHandle x, Array2DHandle a, Array1DHandle y) {
    return CxVectxAAligned_head(x, a, y, 0);
}

TW_API int32_t DotProduct_head(Array1DHandle x, Array1DHandle y, double* result, int32_t* status) {
    return ToPointer(status, Dot<double>(x, y, result));
}

TW_API int32_t DotprodCx(Array1DHandle x, Array1DHandle y, ComplexDouble* result, int32_t* status) {
    return ToPointer(status, Dot<cdouble>(x, y, reinterpret_cast<cdouble*>(result)));
}

TW_API int32_t OuterProd_head(Array1DHandle x, Array1DHandle y, Array2DHandle m, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Outer<double>(x, y, m, host); });
}

TW_API int32_t OuterProdCx_head(Array1DHandle x, Array1DHandle y, Array2DHandle m, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Outer<cdouble>(x, y, m, host); });
}

TW_API int32_t Trace_head(Array2DHandle a, double* result, int32_t* status) {
    return ToPointer(status, Trace<double>(a, result));
}

TW_API int32_t CxTrace_head(Array2DHandle a, ComplexDouble* result, int32_t* status) {
    return ToPointer(status, Trace<cdouble>(a, reinterpret_cast<cdouble*>(result)));
}

TW_API int32_t Norm_head(Array2DHandle a, MatrixNormType* type, double* result, int32_t* status) {
    return ToPointer(status, Norm<double>(a, type, result));
}

TW_API int32_t CxNorm_head(Array2DHandle a, MatrixNormType* type, double* result, int32_t* status) {
    return ToPointer(status, Norm<cdouble>(a, type, result));
}

TW_API int32_t vectorNormH(Array1DHandle x, double p, double* result) { return VecNorm<double>(x, p, result); }

TW_API int32_t CxVectorNormH(Array1DHandle x, double p, double* result) { return VecNorm<cdouble>(x, p, result); }

TW_API int32_t Rank_head(Array2DHandle a, double* tol, int32_t* rank, int32_t* status) {
    return ToPointer(status, Rank<double>(a, tol, rank));
}

TW_API int32_t CxRank_head(Array2DHandle a, double* tol, int32_t* rank, int32_t* status) {
    return ToPointer(status, Rank<cdouble>(a, tol, rank));
}

TW_API int32_t CondNumber_head(Array2DHandle a, int32_t* type, double* cond, int32_t* status) {
    return ToPointer(status, Cond<double>(a, type, cond));
}

TW_API int32_t CxCondNumber_head(Array2DHandle a, int32_t* type, double* cond, int32_t* status) {
    return ToPointer(status, Cond<cdouble>(a, type, cond));
}

TW_API int32_t InitialMatrixH(int32_t rows, int32_t cols, Array2DHandle m) {
    return InitialMatrix<double>(rows, cols, m);
}

TW_API int32_t CxInitialMatrixH(int32_t rows, int32_t cols, Array2DHandle m) {
    return InitialMatrix<cdouble>(rows, cols, m);
}
