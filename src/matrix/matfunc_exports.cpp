// Frames of the matrix functions, generated matrices, checks and matrix equations.
#include <algorithm>
#include <cstring>

#include "matrix/matrix_frame.hpp"
#include "matrix/matrix_functions.hpp"
#include "twanlys/matrix_functions.h"

using namespace tw;

namespace {

size_t Square(int32_t n) { return static_cast<size_t>(n) * static_cast<size_t>(n); }

// Empty, then not square: the later test wins.
Status SquareLast(Shape d) {
    Status s = Elements(d) <= 0 ? EmptyArrayErr : 0;
    if (d.rows != d.cols) s = NotSquareErr;
    return s;
}
// Not square first, then empty.
Status SquareFirst(Shape d) { return d.rows != d.cols ? NotSquareErr : d.rows < 1 ? EmptyArrayErr : 0; }
// Empty first, then not square.
Status EmptyFirst(Shape d) { return Elements(d) <= 0 ? EmptyArrayErr : d.rows != d.cols ? NotSquareErr : 0; }

template <class T> Status Exp(Handle& a) {
    Frame f;
    T* pa = nullptr;
    Status s = SquareLast(Dims(a));
    const Status view = f.InPlace2D(a, &pa);
    if (s == 0) s = view;
    if (s == 0) s = MatrixExp<T>(pa, Dims(a).rows);
    return f.Finish(s);
}

// Logarithm (sqrt false) or square root of a matrix into a complex block: b, or a itself when b is
// null; a real target keeps the real parts.
template <class T, bool Sqrt>
Status ComplexFunction(Handle& a, Handle* b, int32_t* host) {
    Frame f;
    if (b != nullptr) f.Output2D<cdouble>(*b);
    const Shape d = Dims(a);
    const int32_t n = d.rows;
    Status s = SquareLast(d);
    T* pa = nullptr;
    const T* src = nullptr;
    const Status view = b != nullptr ? f.In2D<T>(a, &src) : f.InPlace2D(a, &pa);
    if (s == 0) s = view;
    if (b == nullptr) src = pa;
    cdouble* pb = nullptr;
    if (s == 0 && b != nullptr) s = Out2D(f, *b, n, n, &pb, host);
    Scratch<cdouble> work;
    if (s == 0) s = work.Allocate(2 * Square(n));
    if (s == 0) {
        cdouble *in = work.get(), *out = in + Square(n);
        for (size_t i = 0; i < Square(n); ++i) in[i] = src[i];
        const int32_t realInput = kIsComplex<T> ? 0 : 1;
        s = Sqrt ? CxMatrixSqrt(in, n, out, realInput) : CxMatrixLog(in, n, out, realInput);
        if (s >= 0) {
            if (pb != nullptr) {
                std::copy(out, out + Square(n), pb);
            } else {
                for (size_t i = 0; i < Square(n); ++i) {
                    if constexpr (kIsComplex<T>)
                        pa[i] = out[i];
                    else
                        pa[i] = out[i].real();
                }
            }
        }
    }
    return f.Finish(MergeRelease(s, work.Release()));
}

template <class T> Status Power(Handle& a, int32_t power) {
    Frame f;
    T* pa = nullptr;
    Status s = SquareFirst(Dims(a));
    const Status view = f.InPlace2D(a, &pa);
    if (s == 0) s = view;
    if (s == 0) s = MatrixPower<T>(pa, Dims(a).rows, power);
    return f.Finish(s);
}

template <class T, class C> Status CharPoly(Handle a, Handle& c, int32_t* host) {
    Frame f;
    f.Output<C>(c);
    const Shape d = Dims(a);
    const int32_t n = d.rows;
    Status s = SquareFirst(d);
    const T* pa = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    Scratch<cdouble> poly;
    if (s == 0) s = poly.Allocate(static_cast<size_t>(n) + 1);
    if (s == 0) s = CharacteristicPoly<T>(pa, n, poly.get());
    C* pc = nullptr;
    if (s == 0) s = Out1D(f, c, n + 1, &pc, host);
    if (s == 0) {
        for (int32_t i = 0; i <= n; ++i) {
            if constexpr (kIsComplex<C>)
                pc[i] = poly[i];
            else
                pc[i] = poly[i].real();
        }
    }
    return f.Finish(MergeRelease(s, poly.Release()));
}

template <class T> Status Kronecker(Handle a, Handle b, Handle& c) {
    Frame f;
    f.Output2D<T>(c);
    int32_t host = 0;
    const Shape da = Dims(a), db = Dims(b);
    Status s = Elements(da) <= 0 || Elements(db) <= 0 ? EmptyArrayErr : 0;
    const int64_t rows = int64_t{da.rows} * db.rows, cols = int64_t{da.cols} * db.cols;
    if (s == 0 && (rows > INT32_MAX || cols > INT32_MAX)) s = OutOfMemoryErr;
    const T *pa = nullptr, *pb = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = f.In2D(b, &pb);
    T* pc = nullptr;
    if (s == 0) s = Out2D(f, c, static_cast<int32_t>(rows), static_cast<int32_t>(cols), &pc, &host);
    if (s == 0) KroneckerProduct(pa, da.rows, da.cols, pb, db.rows, db.cols, pc);
    return f.Finish(s);
}

template <class T> Status Special(int32_t type, int32_t size, Handle x, Handle y, Handle& m, int32_t* host) {
    Frame f;
    f.Output2D<T>(m);
    int32_t rows = 0, cols = 0;
    Status s = SpecialMatrixShape(type, size, Count(x), Count(y), &rows, &cols);
    const T *px = nullptr, *py = nullptr;
    if (s == 0) s = f.In(x, &px);
    if (s == 0) s = f.In(y, &py);
    T* pm = nullptr;
    if (s == 0) s = Out2D(f, m, rows, cols, &pm, host);
    if (s == 0) SpecialMatrix(type, px, Count(x), py, rows, cols, pm);
    return f.Finish(s);
}

template <class T>
Status AutoCorr(Handle x, Handle& prev, Handle& r, Handle& xm, int32_t m, int32_t type, int32_t* count,
                int32_t* reset) {
    Frame f;
    f.Output2D<T>(r);
    f.Output2D<T>(xm);
    int32_t host = 0;
    const int32_t n = Count(x);
    Status s = n < 1 ? EmptyArrayErr : m < 0 ? NegativeArgumentErr : 0;
    if (s == 0 && (type == 3 || type == 4) && n <= m) s = PolyOrderErr;
    if (s == 0 && Count(prev) != m) s = InternalErr;
    const int32_t rows = s == 0 ? AutoCorrRows(type, n, m) : 0;
    if (s == 0 && rows < 0) s = InvalidSelectorErr;
    const bool fresh = *count <= 0 || (reset != nullptr && *reset != 0);
    if (s == 0 && !fresh && (Dims(r).rows != m + 1 || Dims(r).cols != m + 1)) s = SizeMismatchErr;
    const T *px = nullptr, *pp = nullptr;
    if (s == 0) s = f.In(x, &px);
    // prev is an input that must not shrink on failure: it is written back by hand on success.
    if (s == 0) s = f.In(prev, &pp);
    Scratch<T> tail;
    if (s == 0) s = tail.Allocate(static_cast<size_t>(m) + 1);
    if (s == 0 && m > 0) std::copy(pp, pp + m, tail.get());
    T *pr = nullptr, *pxm = nullptr;
    if (s == 0) {
        if (fresh) {
            s = Out2D(f, r, m + 1, m + 1, &pr, &host);
            if (s == 0) std::fill(pr, pr + Square(m + 1), T(0));
        } else {
            s = f.InPlace2D(r, &pr);
        }
    }
    if (s == 0) s = Out2D(f, xm, fresh ? rows : n, m + 1, &pxm, &host);
    if (s == 0) s = AutoCorrMatrix(px, n, tail.get(), m, type, fresh ? 0 : *count, pr, pxm);
    if (s == 0) {
        *count = fresh ? n : *count + n;
        if (m > 0) std::memcpy(static_cast<unsigned char*>(*prev) + 4, tail.get(), static_cast<size_t>(m) * sizeof(T));
    }
    return f.Finish(MergeRelease(s, tail.Release()));
}

template <class T> Status CheckSym(Handle a, double tol, int32_t relative, int32_t hermitian, int32_t* result) {
    Frame f;
    if (result != nullptr) *result = 0;
    Status s = EmptyFirst(Dims(a));
    const T* pa = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    int32_t r = 0;
    if (s == 0) s = CheckSymmetric(pa, Dims(a).rows, tol, relative, hermitian, &r);
    if (s == 0 && result != nullptr) *result = r;
    return f.Finish(s);
}

template <class T> Status CheckPd(Handle a, int32_t* result) {
    Frame f;
    *result = 0;
    Status s = EmptyFirst(Dims(a));
    const T* pa = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = CheckPositiveDefinite(pa, Dims(a).rows, result);
    return f.Finish(s);
}

template <class T> Status CheckPsd(Handle a, double tol, int32_t* result, int32_t* rank) {
    Frame f;
    *result = 0;
    *rank = -1;
    Status s = EmptyFirst(Dims(a));
    const T* pa = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = CheckPositiveSemiDefinite(pa, Dims(a).rows, tol, result, rank);
    return f.Finish(s);
}

// A failed equation leaves its scale at 1.0.
Status ScaleOnFailure(Status s, double* scale) {
    if (s < 0 && scale != nullptr) *scale = 1.0;
    return s;
}

template <class T> Status LyapunovFrame(Handle a, Handle& q, int32_t form, int32_t type, double* scale) {
    Frame f;
    const Shape da = Dims(a), dq = Dims(q);
    Status s = da.rows != da.cols ? NotSquareErr : da.rows < 1 ? EmptyArrayErr : 0;
    if (s == 0 && (dq.rows != da.rows || dq.cols != da.cols)) s = EqSamplesErr;
    if (s == 0 && static_cast<uint32_t>(type) > 1) s = InvalidSelectorErr;
    const T* pa = nullptr;
    T* pq = nullptr;
    const Status view = f.InPlace2D(q, &pq);
    if (s == 0) s = view;
    if (s == 0) s = f.In2D(a, &pa);
    double sc = 1.0;
    if (s == 0) s = Lyapunov<T>(pa, pq, da.rows, form, type, &sc);
    if (scale != nullptr) *scale = sc;
    return ScaleOnFailure(f.Finish(s), scale);
}

template <class T>
Status SylvesterFrame(Handle a, Handle b, Handle& c, int32_t transA, int32_t transB, int32_t sign, int32_t form,
                      double* scale, int32_t* perturbed) {
    Frame f;
    const Shape da = Dims(a), db = Dims(b), dc = Dims(c);
    Status s = da.rows != da.cols || db.rows != db.cols ? NotSquareErr : 0;
    if (s == 0 && (dc.rows != da.rows || dc.cols != db.rows)) s = EqSamplesErr;
    if (s == 0 && (da.rows < 1 || db.rows < 1)) s = EmptyArrayErr;
    const T *pa = nullptr, *pb = nullptr;
    T* pc = nullptr;
    const Status view = f.InPlace2D(c, &pc);
    if (s == 0) s = view;
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = f.In2D(b, &pb);
    double sc = 1.0;
    int32_t pert = 0;
    if (s == 0) s = Sylvester<T>(pa, pb, pc, da.rows, db.rows, transA, transB, sign, form, &sc, &pert);
    if (scale != nullptr) *scale = sc;
    if (perturbed != nullptr) *perturbed = pert;
    return ScaleOnFailure(f.Finish(s), scale);
}

}  // namespace

TW_API int32_t MatrixExp_head(Array2DHandle a, int32_t* status) { return ToPointer(status, Exp<double>(a)); }
TW_API int32_t CxMatrixExp_head(Array2DHandle a, int32_t* status) { return ToPointer(status, Exp<cdouble>(a)); }

TW_API int32_t MatrixLn_head(Array2DHandle a, Array2DHandle b, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return ComplexFunction<double, false>(a, &b, host); });
}
TW_API int32_t CxMatrixLn_head(Array2DHandle a, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return ComplexFunction<cdouble, false>(a, nullptr, host); });
}
TW_API int32_t MatrixSqrt_head(Array2DHandle a, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return ComplexFunction<double, true>(a, nullptr, host); });
}
TW_API int32_t MatrixSqrtH(Array2DHandle a, Array2DHandle b) {
    int32_t host = 0;
    return ComplexFunction<double, true>(a, &b, &host);
}
TW_API int32_t CxMatrixSqrt_head(Array2DHandle a, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return ComplexFunction<cdouble, true>(a, nullptr, host); });
}

TW_API int32_t MatrixPower_head(Array2DHandle a, int32_t power) { return Power<double>(a, power); }
TW_API int32_t CxMatrixPower_head(Array2DHandle a, int32_t power) { return Power<cdouble>(a, power); }

TW_API int32_t MatrixCharacteristicPoly_head(Array2DHandle a, Array1DHandle c, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return CharPoly<double, double>(a, c, host); });
}
TW_API int32_t CxMatrixCharacteristicPoly_head(Array2DHandle a, Array1DHandle c) {
    int32_t host = 0;
    return CharPoly<cdouble, cdouble>(a, c, &host);
}

TW_API int32_t KroneckerProd_H(Array2DHandle a, Array2DHandle b, Array2DHandle c) { return Kronecker<double>(a, b, c); }
TW_API int32_t CxKroneckerProd_H(Array2DHandle a, Array2DHandle b, Array2DHandle c) {
    return Kronecker<cdouble>(a, b, c);
}

TW_API int32_t SpecialMatrix_head(SpecialMatrixType* type, int32_t* size, Array1DHandle x, Array1DHandle y,
                                  Array2DHandle m, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Special<double>(*type, *size, x, y, m, host); });
}
TW_API int32_t CxSpecialMatrix_head(SpecialMatrixType* type, int32_t* size, Array1DHandle x, Array1DHandle y,
                                    Array2DHandle m, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Special<cdouble>(*type, *size, x, y, m, host); });
}

TW_API int32_t AutoCorrMtrxH(Array1DHandle x, Array1DHandle prev, Array2DHandle r, Array2DHandle xm, int32_t m,
                             AutoCorrType type, int32_t* count, int32_t* reset) {
    return AutoCorr<double>(x, prev, r, xm, m, type, count, reset);
}
TW_API int32_t CxAutoCorrMtrxH(Array1DHandle x, Array1DHandle prev, Array2DHandle r, Array2DHandle xm, int32_t m,
                               AutoCorrType type, int32_t* count, int32_t* reset) {
    return AutoCorr<cdouble>(x, prev, r, xm, m, type, count, reset);
}

TW_API int32_t CheckSym_head(Array2DHandle a, double tol, int32_t relative, int32_t* result) {
    return CheckSym<double>(a, tol, relative, 0, result);
}
TW_API int32_t CxCheckSym_head(Array2DHandle a, double tol, int32_t relative, int32_t hermitian, int32_t* result) {
    return CheckSym<cdouble>(a, tol, relative, hermitian, result);
}
TW_API int32_t CheckPosdef_head(Array2DHandle a, int32_t* result, int32_t* status) {
    return ToPointer(status, CheckPd<double>(a, result));
}
TW_API int32_t CxCheckPosdef_head(Array2DHandle a, int32_t* result, int32_t* status) {
    return ToPointer(status, CheckPd<cdouble>(a, result));
}
TW_API int32_t CheckPosSemiDef_head(Array2DHandle a, double tol, int32_t* result, int32_t* rank) {
    return CheckPsd<double>(a, tol, result, rank);
}
TW_API int32_t CxCheckPosSemiDef_head(Array2DHandle a, double tol, int32_t* result, int32_t* rank) {
    return CheckPsd<cdouble>(a, tol, result, rank);
}

TW_API int32_t Lyapunov_head(Array2DHandle a, Array2DHandle q, MatrixForm form, double* scale) {
    return LyapunovFrame<double>(a, q, form, 0, scale);
}
TW_API int32_t CxLyapunov_head(Array2DHandle a, Array2DHandle q, MatrixForm form, double* scale) {
    return LyapunovFrame<cdouble>(a, q, form, 0, scale);
}
TW_API int32_t Lyapunov85_head(Array2DHandle a, Array2DHandle q, MatrixForm form, LyapunovType type, double* scale) {
    return LyapunovFrame<double>(a, q, form, type, scale);
}
TW_API int32_t CxLyapunov85_head(Array2DHandle a, Array2DHandle q, MatrixForm form, LyapunovType type,
                                 double* scale) {
    return LyapunovFrame<cdouble>(a, q, form, type, scale);
}
TW_API int32_t Sylvester_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t transA, int32_t transB,
                              int32_t sign, double* scale, int32_t* perturbed) {
    return SylvesterFrame<double>(a, b, c, transA, transB, sign, 1, scale, perturbed);
}
TW_API int32_t CxSylvester_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t transA, int32_t transB,
                                int32_t sign, double* scale, int32_t* perturbed) {
    return SylvesterFrame<cdouble>(a, b, c, transA, transB, sign, 1, scale, perturbed);
}
TW_API int32_t Sylvester81_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t transA, int32_t transB,
                                int32_t sign, MatrixForm form, double* scale, int32_t* perturbed) {
    return SylvesterFrame<double>(a, b, c, transA, transB, sign, form, scale, perturbed);
}
TW_API int32_t CxSylvester81_head(Array2DHandle a, Array2DHandle b, Array2DHandle c, int32_t transA, int32_t transB,
                                  int32_t sign, MatrixForm form, double* scale, int32_t* perturbed) {
    return SylvesterFrame<cdouble>(a, b, c, transA, transB, sign, form, scale, perturbed);
}
