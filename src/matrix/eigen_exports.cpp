// Frames of the eigenproblem exports: standard problems, Schur forms, QZ, back-transformation
// after balancing and the companion matrix.
#include <algorithm>
#include <cstring>

#include "matrix/eigen.hpp"
#include "matrix/matrix_frame.hpp"
#include "twanlys/matrix_eigen.h"

using namespace tw;

namespace {

size_t Square(int32_t n) { return static_cast<size_t>(n) * static_cast<size_t>(n); }

template <class T>
void CopyOut(T* dst, const T* src, size_t count) {
    if (count > 0) std::memcpy(static_cast<void*>(dst), src, count * sizeof(T));
}

// Real general matrix; both outputs are emptied before anything else.
Status RealEigen(Handle a, int32_t output, Handle& values, Handle& vectors, int32_t* host) {
    Frame f;
    cdouble *pv = nullptr, *pz = nullptr;
    Status s = Out1D(f, values, 0, &pv, host);
    if (s == 0) s = Out2D(f, vectors, 0, 0, &pz, host);
    const Shape d = Dims(a);
    const int32_t n = d.rows;
    if (s == 0) s = d.rows != d.cols ? NotSquareErr : n < 1 ? EmptyArrayErr : 0;
    const double* pa = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    Scratch<cdouble> work;
    const bool wantV = output != 0;
    if (s == 0) s = work.Allocate(static_cast<size_t>(n) + (wantV ? Square(n) : 0));
    if (s == 0) s = GeneralEigen(pa, n, output, work.get(), wantV ? work.get() + n : nullptr);
    if (s == 0) s = Out1D(f, values, n, &pv, host);
    if (s == 0) s = Out2D(f, vectors, wantV ? n : 0, wantV ? n : 0, &pz, host);
    if (s == 0) {
        CopyOut(pv, work.get(), static_cast<size_t>(n));
        if (wantV) CopyOut(pz, work.get() + n, Square(n));
    }
    return f.Finish(MergeRelease(s, work.Release()));
}

// Complex matrix: the vectors replace A, which is emptied for values only.
Status ComplexEigen(Handle& a, int32_t hermitian, int32_t output, Handle& values, int32_t* host) {
    Frame f;
    f.Output2D<cdouble>(a);
    f.Output<cdouble>(values);
    const Shape d = Dims(a);
    const int32_t n = d.rows;
    Status s = d.rows != d.cols ? NotSquareErr : n < 1 ? EmptyArrayErr : static_cast<uint32_t>(hermitian) > 1 ? InvalidSelectorErr : 0;
    const cdouble* pa = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    Scratch<cdouble> work;
    const bool wantV = output != 0;
    if (s == 0) s = work.Allocate(static_cast<size_t>(n) + (wantV ? Square(n) : 0));
    cdouble* vecs = wantV ? work.get() + n : nullptr;
    if (s == 0)
        s = hermitian != 0 ? HermitianEigen(pa, n, output, work.get(), vecs) : CxGeneralEigen(pa, n, output, work.get(), vecs);
    cdouble *pv = nullptr, *pz = nullptr;
    if (s == 0) s = Out1D(f, values, n, &pv, host);
    if (s == 0) s = Out2D(f, a, wantV ? n : 0, wantV ? n : 0, &pz, host);
    if (s == 0) {
        CopyOut(pv, work.get(), static_cast<size_t>(n));
        if (wantV) CopyOut(pz, vecs, Square(n));
    }
    return f.Finish(MergeRelease(s, work.Release()));
}

// Real symmetric: ascending values; A holds the vectors, or is emptied for values only.
Status Symmetric(Handle& a, int32_t output, Handle& values, int32_t* host) {
    Frame f;
    f.Output2D<double>(a);
    f.Output<double>(values);
    const Shape d = Dims(a);
    const int32_t n = d.rows;
    Status s = d.rows != d.cols ? NotSquareErr : n < 1 ? EmptyArrayErr : 0;
    const bool wantV = output != 0;
    const double* pa = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    Scratch<double> work;
    if (s == 0) s = work.Allocate(static_cast<size_t>(n) + (wantV ? Square(n) : 0));
    double* vecs = wantV ? work.get() + n : nullptr;
    if (s == 0) s = SymmetricEigen(pa, n, output, work.get(), vecs);
    double *pv = nullptr, *pz = nullptr;
    if (s == 0) s = Out1D(f, values, n, &pv, host);
    if (s == 0) s = Out2D(f, a, wantV ? n : 0, wantV ? n : 0, &pz, host);
    if (s == 0) {
        CopyOut(pv, work.get(), static_cast<size_t>(n));
        if (wantV) CopyOut(pz, vecs, Square(n));
    }
    return f.Finish(MergeRelease(s, work.Release()));
}

Status Companion(Handle values, Handle& m, int32_t* host) {
    Frame f;
    f.Output2D<double>(m);
    const int32_t n = Count(values);
    Status s = n < 1 ? EmptyArrayErr : 0;
    const cdouble* pr = nullptr;
    if (s == 0) s = f.In(values, &pr);
    Scratch<cdouble> c;
    if (s == 0) s = c.Allocate(static_cast<size_t>(n) + 1);
    double* pm = nullptr;
    if (s == 0) s = Out2D(f, m, n, n, &pm, host);
    if (s == 0) {
        const int32_t degree = PolyFromRoots(pr, n, c.get());
        std::fill(pm, pm + Square(n), 0.0);
        for (int32_t i = 0; i + 1 < n; ++i) pm[static_cast<size_t>(i) * n + i + 1] = 1;
        // A shorter polynomial leaves zeros; imaginary parts are dropped.
        for (int32_t j = 0; j < std::min(degree, n); ++j) pm[static_cast<size_t>(n - 1) * n + j] = -c[j].real();
    }
    return f.Finish(MergeRelease(s, c.Release()));
}

}  // namespace

TW_API int32_t EigenValueVector_head(Array2DHandle a, EigenOutput* output, Array1DHandle values,
                                     Array2DHandle vectors, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return RealEigen(a, *output, values, vectors, host); });
}

TW_API int32_t CxEigenValueVector_head(Array2DHandle a, int32_t* hermitian, EigenOutput* output,
                                       Array1DHandle values, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return ComplexEigen(a, *hermitian, *output, values, host); });
}

TW_API int32_t SymEvectorEvalue_head(Array2DHandle a, EigenOutput* output, Array1DHandle values, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Symmetric(a, *output, values, host); });
}

TW_API int32_t CreateMatrixFromEVs_head(Array1DHandle values, Array2DHandle m, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Companion(values, m, host); });
}
