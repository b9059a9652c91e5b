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
    f.Output<cdouble>(values);
    f.Output2D<cdouble>(vectors);
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
    cdouble* vecs = s == 0 && wantV ? work.get() + n : nullptr;
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
    double* vecs = s == 0 && wantV ? work.get() + n : nullptr;
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

namespace {

// Schur form: T replaces A; Q is emptied when not wanted.
template <class T>
Status Schur(Handle& a, int32_t wantQ, uint32_t order, Handle& q, Handle& values) {
    Frame f;
    f.Output2D<T>(a);
    f.Output2D<T>(q);
    f.Output<cdouble>(values);
    const Shape d = Dims(a);
    const int32_t n = d.rows;
    const bool withQ = wantQ != 0;
    int32_t host = 0;
    Status s = d.rows != d.cols ? NotSquareErr : n < 1 ? EmptyArrayErr : 0;
    const T* pa = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    Scratch<T> work;
    Scratch<cdouble> w;
    if (s == 0) s = work.Allocate(Square(n) * (withQ ? 2 : 1));
    if (s == 0) s = w.Allocate(static_cast<size_t>(n));
    T* qb = s == 0 && withQ ? work.get() + Square(n) : nullptr;
    if (s == 0) {
        if constexpr (kIsComplex<T>)
            s = CxSchurDecomp(pa, n, order, nullptr, nullptr, qb, work.get(), w.get());
        else
            s = SchurDecomp(pa, n, order, nullptr, nullptr, qb, work.get(), w.get());
    }
    T *pt = nullptr, *pq = nullptr;
    cdouble* pv = nullptr;
    if (s == 0) s = Out2D(f, a, n, n, &pt, &host);
    if (s == 0) s = Out2D(f, q, withQ ? n : 0, withQ ? n : 0, &pq, &host);
    if (s == 0) s = Out1D(f, values, n, &pv, &host);
    if (s == 0) {
        CopyOut(pt, work.get(), Square(n));
        if (withQ) CopyOut(pq, qb, Square(n));
        CopyOut(pv, w.get(), static_cast<size_t>(n));
    }
    return f.Finish(MergeRelease(MergeRelease(s, work.Release()), w.Release()));
}

// The shape tests shared by the QZ frames.
Status PencilShape(Handle a, Handle b, int32_t* n) {
    const Shape da = Dims(a), db = Dims(b);
    *n = da.rows;
    if (da.rows != da.cols || db.rows != db.cols) return NotSquareErr;
    if (da.rows != db.rows) return BandStructureErr;
    return da.rows < 1 ? EmptyArrayErr : 0;
}

// The generalised Schur form with one retry by the driver after a failed exchange.
template <class T>
Status QzWithRetry(bool retry, const T* a, const T* b, int32_t n, int32_t rowMajorQ, int32_t mode, int32_t order,
                   T* s, T* t, T* q, T* z, cdouble* alpha, T* beta, T* right, T* left) {
    Status st = GeneralisedSchur<T>(a, b, n, rowMajorQ, mode, order, 0, s, t, q, z, alpha, beta, right, left);
    if (retry && st == FactorisationFailedErr)
        st = GeneralisedSchur<T>(a, b, n, rowMajorQ, mode, order, 1, s, t, q, z, alpha, beta, right, left);
    return st;
}

// Real eigenvectors in LAPACK's storage as complex columns: a pair (alpha with a non-zero
// imaginary part) gives x + iy and x - iy from columns j and j + 1.
void ExpandVectors(const double* v, const cdouble* alpha, int32_t n, cdouble* out) {
    for (int32_t j = 0; j < n; ++j) {
        if (alpha[j].imag() != 0 && j + 1 < n) {
            for (int32_t i = 0; i < n; ++i) {
                const double x = v[static_cast<size_t>(i) * n + j], y = v[static_cast<size_t>(i) * n + j + 1];
                out[static_cast<size_t>(i) * n + j] = cdouble(x, y);
                out[static_cast<size_t>(i) * n + j + 1] = cdouble(x, -y);
            }
            ++j;
        } else {
            for (int32_t i = 0; i < n; ++i) out[static_cast<size_t>(i) * n + j] = v[static_cast<size_t>(i) * n + j];
        }
    }
}
void ExpandVectors(const cdouble* v, const cdouble*, int32_t n, cdouble* out) { CopyOut(out, v, Square(n)); }

// A gets the left Schur vectors, B the right ones (row-major), with alpha, beta and the right
// eigenvectors.
template <class T>
Status Qz80(Handle& a, Handle& b, int32_t mode, uint32_t order, Handle& alpha, Handle& beta, Handle& vectors) {
    Frame f;
    f.Output2D<T>(a);
    f.Output2D<T>(b);
    f.Output<cdouble>(alpha);
    f.Output<T>(beta);
    f.Output2D<cdouble>(vectors);
    int32_t n = 0, host = 0;
    Status s = PencilShape(a, b, &n);
    if (s == 0 && order > 4) s = InvalidSelectorErr;
    const T *pa = nullptr, *pb = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = f.In2D(b, &pb);
    Scratch<T> work;
    Scratch<cdouble> al;
    if (s == 0) s = work.Allocate(3 * Square(n) + static_cast<size_t>(n));
    if (s == 0) s = al.Allocate(static_cast<size_t>(n));
    T* q = s == 0 ? work.get() : nullptr;  // the blocks exist only once the allocation stood
    T* z = q != nullptr ? q + Square(n) : nullptr;
    T* right = z != nullptr ? z + Square(n) : nullptr;
    T* bt = right != nullptr ? right + Square(n) : nullptr;
    if (s == 0)
        s = QzWithRetry<T>(true, pa, pb, n, 1, mode != 0 ? 1 : 0, static_cast<int32_t>(order), nullptr, nullptr, q, z,
                           al.get(), bt, right, nullptr);
    T *pq = nullptr, *pz = nullptr, *pbeta = nullptr;
    cdouble *palpha = nullptr, *pv = nullptr;
    if (s >= 0) s = MergeRelease(Out2D(f, a, n, n, &pq, &host), s);
    if (s >= 0) s = MergeRelease(Out2D(f, b, n, n, &pz, &host), s);
    if (s >= 0) s = MergeRelease(Out1D(f, alpha, n, &palpha, &host), s);
    if (s >= 0) s = MergeRelease(Out1D(f, beta, n, &pbeta, &host), s);
    if (s >= 0) s = MergeRelease(Out2D(f, vectors, n, n, &pv, &host), s);
    if (s >= 0) {
        CopyOut(pq, q, Square(n));
        CopyOut(pz, z, Square(n));
        CopyOut(palpha, al.get(), static_cast<size_t>(n));
        CopyOut(pbeta, bt, static_cast<size_t>(n));
        ExpandVectors(right, al.get(), n, pv);
    }
    return f.Finish(MergeRelease(MergeRelease(s, work.Release()), al.Release()));
}

// The generalised Schur form: A gets S, B gets T, q the left factor as LAPACK holds it (read
// row-major it is Q^T, so that S = q A z), z row-major, and the wanted eigenvectors.
template <class T>
Status TmiQz(Handle& a, Handle& b, Handle& q, Handle& z, Handle& alpha, Handle& beta, int32_t which, Handle& right,
             Handle& left) {
    Frame f;
    for (Handle* h : {&a, &b, &q, &z, &right, &left}) f.Output2D<T>(*h);
    f.Output<cdouble>(alpha);
    f.Output<T>(beta);
    int32_t n = 0, host = 0;
    Status s = PencilShape(a, b, &n);
    if (s == 0 && static_cast<uint32_t>(which) > 3) s = InvalidSelectorErr;
    const bool wantR = which == 1 || which == 3, wantL = which == 2 || which == 3;
    const T *pa = nullptr, *pb = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = f.In2D(b, &pb);
    Scratch<T> work;
    Scratch<cdouble> al;
    if (s == 0) s = work.Allocate(6 * Square(n) + static_cast<size_t>(n));
    if (s == 0) s = al.Allocate(static_cast<size_t>(n));
    T* blocks[6] = {};
    T* bt = nullptr;
    if (s == 0) {  // the blocks exist only once the allocation stood
        for (int k = 0; k < 6; ++k) blocks[k] = work.get() + Square(n) * static_cast<size_t>(k);
        bt = work.get() + 6 * Square(n);
    }
    if (s == 0)
        s = QzWithRetry<T>(!kIsComplex<T>, pa, pb, n, 0, 1, 0, blocks[0], blocks[1], blocks[2], blocks[3], al.get(),
                           bt, wantR ? blocks[4] : nullptr, wantL ? blocks[5] : nullptr);
    const int32_t sizes[6] = {n, n, n, n, wantR ? n : 0, wantL ? n : 0};
    Handle* outs[6] = {&a, &b, &q, &z, &right, &left};
    T* p[6] = {};
    T* pbeta = nullptr;
    cdouble* palpha = nullptr;
    for (int k = 0; k < 6 && s >= 0; ++k) s = MergeRelease(Out2D(f, *outs[k], sizes[k], sizes[k], &p[k], &host), s);
    if (s >= 0) s = MergeRelease(Out1D(f, alpha, n, &palpha, &host), s);
    if (s >= 0) s = MergeRelease(Out1D(f, beta, n, &pbeta, &host), s);
    if (s >= 0) {
        for (int k = 0; k < 6; ++k) CopyOut(p[k], blocks[k], Square(sizes[k]));
        CopyOut(palpha, al.get(), static_cast<size_t>(n));
        CopyOut(pbeta, bt, static_cast<size_t>(n));
    }
    return f.Finish(MergeRelease(MergeRelease(s, work.Release()), al.Release()));
}

cdouble Quotient(cdouble alpha, double beta) {
    // A zero imaginary part stays 0 even where beta is 0.
    return {alpha.real() / beta, alpha.imag() != 0 ? alpha.imag() / beta : 0.0};
}
cdouble Quotient(cdouble alpha, cdouble beta) {
    if (alpha.imag() == 0 && beta.imag() == 0) return {alpha.real() / beta.real(), 0.0};
    return Divide(alpha, beta);
}

// Generalised eigenvalues alpha / beta and optionally the right vectors; A and B are inputs.
template <class T>
Status GenEigen(Handle a, Handle b, int32_t wantVectors, Handle& values, Handle& vectors) {
    Frame f;
    f.Output<cdouble>(values);
    f.Output2D<cdouble>(vectors);
    int32_t n = 0, host = 0;
    Status s = PencilShape(a, b, &n);
    if (s == 0 && static_cast<uint32_t>(wantVectors) > 1) s = InvalidSelectorErr;
    const bool wantV = wantVectors == 1;
    const T *pa = nullptr, *pb = nullptr;
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = f.In2D(b, &pb);
    Scratch<T> work;
    Scratch<cdouble> al;
    if (s == 0) s = work.Allocate((wantV ? Square(n) : 0) + static_cast<size_t>(n));
    if (s == 0) s = al.Allocate(static_cast<size_t>(n));
    T* bt = s == 0 ? work.get() : nullptr;
    T* right = s == 0 && wantV ? bt + n : nullptr;
    if (s == 0)
        s = QzWithRetry<T>(true, pa, pb, n, 1, 0, 0, nullptr, nullptr, nullptr, nullptr, al.get(), bt, right, nullptr);
    cdouble *pv = nullptr, *pz = nullptr;
    if (s >= 0) s = MergeRelease(Out1D(f, values, n, &pv, &host), s);
    if (s >= 0) s = MergeRelease(Out2D(f, vectors, wantV ? n : 0, wantV ? n : 0, &pz, &host), s);
    if (s >= 0) {
        for (int32_t i = 0; i < n; ++i) pv[i] = Quotient(al[i], bt[i]);
        if (wantV) ExpandVectors(right, al.get(), n, pz);
    }
    return f.Finish(MergeRelease(MergeRelease(s, work.Release()), al.Release()));
}

// Back-transformation of the rows of V after balancing, on a column-major copy.
template <class T>
Status VBack(Handle& v, int32_t job, int32_t side, int32_t ilo, int32_t ihi, Handle scale) {
    static constexpr char kJobs[] = {'N', 'P', 'S', 'B'};
    Frame f;
    f.Output2D<T>(v);
    const Shape d = Dims(v);
    const int32_t n = d.rows;
    Status s = d.rows != d.cols ? NotSquareErr : n < 1 ? EmptyArrayErr : Count(scale) != n ? EqSamplesErr
               : static_cast<uint32_t>(job) > 3 ? InvalidSelectorErr : 0;
    T* pv = nullptr;
    const double* ps = nullptr;
    const Status view = f.InPlace2D(v, &pv);
    if (s == 0) s = view;
    if (s == 0) s = f.In(scale, &ps);
    if (s == 0 && Screen(pv, n * n)) s = NanInfErr;
    // Limits the driver refuses leave V as it is (its info is ignored); they are tested here, in
    // 64 bits, so that no limit wraps on the way.
    const int64_t lo = int64_t{ilo} + 1, hi = int64_t{ihi} + 1;
    const bool runs = lo >= 1 && lo <= n && hi >= std::min<int64_t>(lo, n) && hi <= n;
    // The driver swaps rows by the permutation entries outside lo..hi unchecked: one that names
    // no row would reach outside V.
    if (s == 0 && runs && (job == 1 || job == 3))
        for (int64_t i = 1; i <= n; ++i)
            if ((i < lo || i > hi) && !(ps[i - 1] >= 1 && ps[i - 1] < static_cast<double>(n) + 1)) s = IndexRangeErr;
    Scratch<T> work;
    if (s == 0 && runs) s = work.Allocate(Square(n));
    if (s == 0 && runs) s = TransposeMatrix<T>(pv, n, n, work.get());
    if (s == 0 && runs) {
        Gebak(kJobs[job], side == 0 ? 'L' : 'R', n, static_cast<int>(lo), static_cast<int>(hi), ps, n, work.get(), n);
        s = TransposeMatrix<T>(work.get(), n, n, pv);
    }
    return f.Finish(MergeRelease(s, work.Release()));
}

}  // namespace

TW_API int32_t Schur_head(Array2DHandle a, int32_t wantQ, Array2DHandle q, Array1DHandle values) {
    return Schur<double>(a, wantQ, 0, q, values);
}

TW_API int32_t CxSchur_head(Array2DHandle a, int32_t wantQ, Array2DHandle q, Array1DHandle values) {
    return Schur<cdouble>(a, wantQ, 0, q, values);
}

TW_API int32_t Schur80_head(Array2DHandle a, int32_t wantQ, SchurOrder order, Array2DHandle q,
                            Array1DHandle values) {
    return Schur<double>(a, wantQ, order, q, values);
}

TW_API int32_t CxSchur80_head(Array2DHandle a, int32_t wantQ, SchurOrder order, Array2DHandle q,
                              Array1DHandle values) {
    return Schur<cdouble>(a, wantQ, order, q, values);
}

TW_API int32_t QZ_head(Array2DHandle a, Array2DHandle b, Array1DHandle alpha, Array1DHandle beta,
                       Array2DHandle vectors) {
    return Qz80<double>(a, b, 0, 0, alpha, beta, vectors);
}

TW_API int32_t CxQZ_head(Array2DHandle a, Array2DHandle b, Array1DHandle alpha, Array1DHandle beta,
                         Array2DHandle vectors) {
    return Qz80<cdouble>(a, b, 0, 0, alpha, beta, vectors);
}

TW_API int32_t QZ80_head(Array2DHandle a, Array2DHandle b, int32_t mode, SchurOrder order, Array1DHandle alpha,
                         Array1DHandle beta, Array2DHandle vectors) {
    return Qz80<double>(a, b, mode, order, alpha, beta, vectors);
}

TW_API int32_t CxQZ80_head(Array2DHandle a, Array2DHandle b, int32_t mode, SchurOrder order, Array1DHandle alpha,
                           Array1DHandle beta, Array2DHandle vectors) {
    return Qz80<cdouble>(a, b, mode, order, alpha, beta, vectors);
}

TW_API int32_t TmiQZ_head(Array2DHandle a, Array2DHandle b, Array2DHandle q, Array2DHandle z, Array1DHandle alpha,
                          Array1DHandle beta, QzVectors which, Array2DHandle right, Array2DHandle left) {
    return TmiQz<double>(a, b, q, z, alpha, beta, which, right, left);
}

TW_API int32_t CxTmiQZ_head(Array2DHandle a, Array2DHandle b, Array2DHandle q, Array2DHandle z,
                            Array1DHandle alpha, Array1DHandle beta, QzVectors which, Array2DHandle right,
                            Array2DHandle left) {
    return TmiQz<cdouble>(a, b, q, z, alpha, beta, which, right, left);
}

TW_API int32_t GenEigenEx_head(Array2DHandle a, Array2DHandle b, int32_t wantVectors, Array1DHandle values,
                               Array2DHandle vectors) {
    return GenEigen<double>(a, b, wantVectors, values, vectors);
}

TW_API int32_t CxGenEigenEx_head(Array2DHandle a, Array2DHandle b, int32_t wantVectors, Array1DHandle values,
                                 Array2DHandle vectors) {
    return GenEigen<cdouble>(a, b, wantVectors, values, vectors);
}

TW_API int32_t EigenVBack_head(Array2DHandle v, EigenBackJob job, int32_t side, int32_t ilo, int32_t ihi,
                               Array1DHandle scale) {
    return VBack<double>(v, job, side, ilo, ihi, scale);
}

TW_API int32_t CxEigenVBack_head(Array2DHandle v, EigenBackJob job, int32_t side, int32_t ilo, int32_t ihi,
                                 Array1DHandle scale) {
    return VBack<cdouble>(v, job, side, ilo, ihi, scale);
}
