// Frames of the solvers, inverses, pseudo-inverse and determinant.
#include <algorithm>
#include <climits>
#include <cstring>

#include "matrix/matrix_frame.hpp"
#include "matrix/solve.hpp"
#include "twanlys/matrix_solve.h"

using namespace tw;

namespace {

bool Empty(Shape d) { return d.rows < 1 || d.cols < 1; }

// Empty, then not square: the first failing test decides.
Status EmptyThenSquare(Shape d) { return Empty(d) ? EmptyArrayErr : d.rows != d.cols ? NotSquareErr : 0; }
// The inversion frames test both and the later test wins.
Status SquareWins(Shape d) { return d.rows != d.cols ? NotSquareErr : Empty(d) ? EmptyArrayErr : 0; }

// The order of a compact array: empty -20003, not triangular -20040.
Status CompactLength(Handle h, int32_t* n) {
    *n = 0;
    const int32_t length = Count(h);
    return length < 1 ? EmptyArrayErr : CompactOrder(length, n);
}

// Exchange lists name rows of the matrix.
Status PermutationInRange(const int32_t* perm, int32_t n) {
    for (int32_t i = 0; i < n; ++i)
        if (perm[i] < 0 || perm[i] >= n) return IndexRangeErr;
    return 0;
}

// --- SVD route -----------------------------------------------------------------------------------

template <class T>
Status LinEqsSvd(Handle a, Handle b, Handle& x, double tol, int32_t* host) {
    Frame f;
    f.Output<T>(x);
    const Shape d = Dims(a);
    const T *pa = nullptr, *pb = nullptr;
    T* px = nullptr;
    Status s = Empty(d) ? EmptyArrayErr : Count(b) != d.rows ? EqSamplesErr : 0;
    if (s == 0) s = Out1D(f, x, d.cols, &px, host);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = f.In(b, &pb);
    if (s == 0) s = SolveBySvd(pa, d.rows, d.cols, pb, 1, px, tol);
    // These frames give the minimum-norm solution of a rank-deficient system without a warning.
    return f.Finish(s == RankDeficientWarn ? 0 : s);
}

// The routes with a caller-owned work handle, sized by a first call of the core. b and x are
// copied through the work block as well, so that nothing is allocated even where the host's 1-D
// blocks are only 4-byte aligned: one spare element leaves room to align.
Status LinEqsWork(Handle a, Handle b, Handle& x, double tol, int32_t refinements, Handle& work) {
    Frame f;
    f.Output<double>(x);
    f.Output<double>(work);
    const Shape d = Dims(a);
    const int32_t m = d.rows, n = d.cols;
    const double* pa = nullptr;
    unsigned char *xBytes = nullptr, *wBytes = nullptr;
    int32_t host = 0;
    size_t needed = 0;
    Status s = Empty(d) ? EmptyArrayErr : Count(b) != m ? EqSamplesErr : 0;
    if (s == 0) s = RawOut1D<double>(f, x, n, &xBytes, &host);
    if (s == 0) s = RefinedSolveBySvd<double>(nullptr, m, n, nullptr, nullptr, tol, refinements, nullptr, &needed);
    const size_t total = needed + static_cast<size_t>(m) + static_cast<size_t>(n) + 1;
    if (s == 0 && total > INT32_MAX) s = OutOfMemoryErr;
    if (s == 0) s = RawOut1D<double>(f, work, static_cast<int32_t>(total), &wBytes, &host);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) {
        double* rhs = AlignedIn<double>(wBytes);
        double* solution = rhs + m;
        std::memcpy(rhs, static_cast<unsigned char*>(*b) + 4, static_cast<size_t>(m) * sizeof(double));
        s = RefinedSolveBySvd(pa, m, n, rhs, solution, tol, refinements, solution + n, nullptr);
        if (s >= 0) std::memcpy(xBytes, solution, static_cast<size_t>(n) * sizeof(double));
    }
    return f.Finish(s == RankDeficientWarn ? 0 : s);
}

template <class T>
Status SetSvd(Handle a, Handle b, Handle& x, double tol) {
    Frame f;
    f.Output2D<T>(x);
    const Shape da = Dims(a), db = Dims(b);
    const T *pa = nullptr, *pb = nullptr;
    T* px = nullptr;
    int32_t host = 0;
    Status s = (Empty(da) || Empty(db)) ? EmptyArrayErr : da.rows != db.rows ? EqSamplesErr : 0;
    if (s == 0) s = Out2D(f, x, da.cols, db.cols, &px, &host);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = f.In2D(b, &pb);
    if (s == 0) s = SolveBySvd(pa, da.rows, da.cols, pb, db.cols, px, tol);
    return f.Finish(s);
}

// --- LU route ------------------------------------------------------------------------------------

template <class T>
Status LinEqsLu(Handle a, Handle b, Handle& x, int32_t* host) {
    Frame f;
    f.Output<T>(x);
    const Shape d = Dims(a);
    const T *pa = nullptr, *pb = nullptr;
    T* px = nullptr;
    Status s = Empty(d) ? EmptyArrayErr : 0;
    // The length test comes second and overrides the first; squareness is the caller's affair.
    if (Count(b) != d.rows) s = EqSamplesErr;
    if (s == 0) s = Out1D(f, x, d.cols, &px, host);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = f.In(b, &pb);
    if (s == 0) s = SolveByLu(pa, d.rows, d.cols, pb, px);
    return f.Finish(s);
}

template <class T>
Status SetLu(Handle a, Handle b, Handle& x) {
    Frame f;
    f.Output2D<T>(x);
    const Shape da = Dims(a), db = Dims(b);
    Status s = (Empty(da) || Empty(db)) ? EmptyArrayErr : da.rows != da.cols ? NotSquareErr : 0;
    if (s == 0 && db.rows != da.rows) s = EqSamplesErr;
    // No route stands behind this export: valid input ends here too.
    return f.Finish(s != 0 ? s : NoSuchCaseErr);
}

template <class T>
Status LuLinEqs(Handle lu, Handle perm, Handle& b) {
    Frame f;
    const Shape d = Dims(lu);
    const int32_t n = d.rows;
    const T* pl = nullptr;
    const int32_t* pp = nullptr;
    T* pb = nullptr;
    Status s = EmptyThenSquare(d);
    if (s == 0 && Count(perm) != n) s = EqSamplesErr;
    if (s == 0 && Count(b) != n) s = EqSamplesErr;
    const Status view = f.InPlace(b, &pb);
    if (s == 0) s = view;
    if (s == 0) s = f.In2D(lu, &pl);
    if (s == 0) s = f.In(perm, &pp);
    if (s == 0) s = PermutationInRange(pp, n);
    if (s == 0) s = LuSolve(pl, pp, pb, n, static_cast<T*>(nullptr));
    return f.Finish(s);
}

// The frame of the inversions in place of a full matrix: core(elements, order).
template <class T, class Core>
Status InvertInPlace(Handle& a, Core core) {
    Frame f;
    T* pa = nullptr;
    Status s = SquareWins(Dims(a));
    const Status view = f.InPlace2D(a, &pa);
    if (s == 0) s = view;
    if (s == 0) s = core(pa, Dims(a).rows);
    return f.Finish(s);
}

template <class T> Status InvLuDri(Handle& a) { return InvertInPlace<T>(a, InvertByLu<T>); }

template <class T>
Status LuInvMatrix(Handle& lu, Handle perm) {
    Frame f;
    const int32_t n = Dims(lu).rows;
    T* pl = nullptr;
    const int32_t* pp = nullptr;
    Status s = SquareWins(Dims(lu));
    if (s == 0 && Count(perm) != n) s = EqSamplesErr;
    const Status view = f.InPlace2D(lu, &pl);
    if (s == 0) s = view;
    if (s == 0) s = f.In(perm, &pp);
    if (s == 0) s = PermutationInRange(pp, n);
    if (s == 0) s = LuInverse(pl, pp, n, pl);
    return f.Finish(s);
}

// --- Cholesky route ------------------------------------------------------------------------------

// The square drivers with a triangle or kind selector: one right-hand side (b 1-D) or several
// (b 2-D), solved by core(a, n, selector, b, k, x).
template <class T, bool Set, class Core>
Status SelectorSolve(Handle a, int32_t selector, Handle b, Handle& x, int32_t* host, Core core) {
    Frame f;
    if (Set)
        f.Output2D<T>(x);
    else
        f.Output<T>(x);
    const Shape d = Dims(a), db = Set ? Dims(b) : Shape{Count(b), 1};
    const T *pa = nullptr, *pb = nullptr;
    T* px = nullptr;
    Status s = (Empty(d) || (Set && Empty(db))) ? EmptyArrayErr : d.rows != d.cols ? NotSquareErr : 0;
    if (s == 0 && db.rows != d.rows) s = EqSamplesErr;
    if (s == 0 && static_cast<uint32_t>(selector) > 1) s = InvalidSelectorErr;
    if (s == 0) s = Set ? Out2D(f, x, d.rows, db.cols, &px, host) : Out1D(f, x, d.rows, &px, host);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = Set ? f.In2D(b, &pb) : f.In(b, &pb);
    if (s == 0) s = core(pa, d.rows, selector, pb, db.cols, px);
    return f.Finish(s);
}

template <class T, bool Set>
Status LinEqsCholesky(Handle a, int32_t triangle, Handle b, Handle& x, int32_t* host) {
    return SelectorSolve<T, Set>(a, triangle, b, x, host, SolveByCholesky<T>);
}

template <class T>
Status CholeskyLinEqs(Handle l, Handle& b) {
    Frame f;
    int32_t n = 0;
    const T* pl = nullptr;
    T* pb = nullptr;
    Status s = CompactLength(l, &n);
    if (s == 0 && Count(b) != n) s = EqSamplesErr;
    const Status view = f.InPlace(b, &pb);
    if (s == 0) s = view;
    if (s == 0) s = f.In(l, &pl);
    if (s == 0) CholeskySolve(pl, pb, n, pb);
    return f.Finish(s);
}

template <class T> Status InvChoDri(Handle& a) { return InvertInPlace<T>(a, InvertByCholesky<T>); }

template <class T>
Status CholeskyInvMatrix(Handle& l) {
    Frame f;
    int32_t n = 0;
    T* pl = nullptr;
    Status s = CompactLength(l, &n);
    const Status view = f.InPlace(l, &pl);
    if (s == 0) s = view;
    if (s == 0) s = InvertFromCholesky(pl, n);
    return f.Finish(s);
}

// --- Triangular route ----------------------------------------------------------------------------

template <class T>
Status TriLinEqs(const CompactMatrix* t, Handle& b) {
    Frame f;
    int32_t n = 0;
    const T* pt = nullptr;
    T* pb = nullptr;
    Status s = CompactLength(t->data, &n);
    if (s == 0 && Count(b) != n) s = EqSamplesErr;
    const Status view = f.InPlace(b, &pb);
    if (s == 0) s = view;
    if (s == 0) s = f.In(t->data, &pt);
    if (s == 0) s = CompactTriSolve(pt, n, pb, 1, t->kind, pb);
    return f.Finish(s);
}

template <class T>
Status TriEqsSet(Handle a, int32_t kind, Handle b, Handle& x) {
    int32_t host = 0;
    return SelectorSolve<T, true>(a, kind, b, x, &host, SolveTriangular<T>);
}

template <class T>
Status InvTriDri(Handle& a, int32_t kind) {
    return InvertInPlace<T>(a, [kind](T* p, int32_t n) { return InvertTriangular(p, n, kind); });
}

template <class T>
Status TriInvMatrix(const CompactMatrix* t) {
    Frame f;
    int32_t n = 0;
    T* pt = nullptr;
    Handle data = t->data;
    Status s = CompactLength(data, &n);
    const Status view = f.InPlace(data, &pt);
    if (s == 0) s = view;
    if (s == 0) s = CompactTriInverse(pt, n, t->kind, pt);
    return f.Finish(s);
}

// --- Band and tridiagonal routes -----------------------------------------------------------------

template <class T, bool Set>
Status Band(Handle ab, Handle& b, int32_t kl, int32_t ku) {
    Frame f;
    const Shape d = Dims(ab), db = Set ? Dims(b) : Shape{Count(b), 1};
    const T* pab = nullptr;
    T* pb = nullptr;
    Status s = static_cast<int64_t>(kl) + 1 + ku != d.rows ? SizeMismatchErr : db.rows != d.cols ? BandStructureErr : 0;
    if (s == 0 && Set && db.cols < 1) s = SizeMismatchErr;
    const Status view = Set ? f.InPlace2D(b, &pb) : f.InPlace(b, &pb);
    if (s == 0) s = view;
    if (s == 0) s = f.In2D(ab, &pab);
    if (s == 0) s = BandSolve(pab, d.cols, kl, ku, pb, db.cols);
    return f.Finish(s);
}

Status TriDiagLu(Handle& dl, Handle& d, Handle& du, Handle& du2, Handle& ipiv) {
    Frame f;
    f.Output<double>(du2);
    f.Output<int32_t>(ipiv);
    const int32_t n = Count(d);
    double *pdl = nullptr, *pd = nullptr, *pdu = nullptr, *pdu2 = nullptr;
    int32_t* pipiv = nullptr;
    int32_t host = 0;
    Status s = n < 3 ? TooFewSamples3Err : (Count(dl) != n - 1 || Count(du) != n - 1) ? SizeMismatchErr : 0;
    const Status views[3] = {f.InPlace(dl, &pdl), f.InPlace(d, &pd), f.InPlace(du, &pdu)};
    for (const Status v : views)
        if (s == 0) s = v;
    if (s == 0) s = Out1D(f, du2, n - 2, &pdu2, &host);
    if (s == 0) s = Out1D(f, ipiv, n, &pipiv, &host);
    if (s == 0) s = TriDiagFactor(pdl, pd, pdu, pdu2, pipiv, n);
    return f.Finish(s);
}

template <bool Set>
Status TriDiagSolveFrame(int32_t trans, Handle dl, Handle d, Handle du, Handle du2, Handle ipiv, Handle& b) {
    Frame f;
    const int32_t n = Count(d);
    const Shape db = Set ? Dims(b) : Shape{Count(b), 1};
    const double *pdl = nullptr, *pd = nullptr, *pdu = nullptr, *pdu2 = nullptr;
    const int32_t* pipiv = nullptr;
    double* pb = nullptr;
    Status s = n < 3 ? TooFewSamples3Err : 0;
    if (s == 0 && (Count(dl) != n - 1 || Count(du) != n - 1 || Count(du2) != n - 2 || Count(ipiv) != n ||
                   db.rows != n || db.cols < 1))
        s = SizeMismatchErr;
    const Status view = Set ? f.InPlace2D(b, &pb) : f.InPlace(b, &pb);
    if (s == 0) s = view;
    if (s == 0) s = f.In(dl, &pdl);
    if (s == 0) s = f.In(d, &pd);
    if (s == 0) s = f.In(du, &pdu);
    if (s == 0) s = f.In(du2, &pdu2);
    if (s == 0) s = f.In(ipiv, &pipiv);
    if (s == 0) s = TriDiagSolve(trans, pdl, pd, pdu, pdu2, pipiv, n, pb, db.cols);
    return f.Finish(s);
}

// --- Pseudo-inverse and determinant --------------------------------------------------------------

template <class T>
Status Pinv(Handle& a, double tol, int32_t* host) {
    Frame f;
    f.Output2D<T>(a);
    const Shape d = Dims(a);
    const T* pa = nullptr;
    T* out = nullptr;
    Scratch<T> result;
    Status s = Empty(d) ? EmptyArrayErr : f.In2D(a, &pa);
    if (s == 0) s = result.Allocate(static_cast<size_t>(d.rows) * d.cols);
    if (s == 0) s = PseudoInverse(pa, d.rows, d.cols, tol, result.get());
    // The n by m result replaces A, rows and columns exchanged in the handle.
    if (s == 0) s = Out2D(f, a, d.cols, d.rows, &out, host);
    if (s == 0) std::memcpy(out, result.get(), static_cast<size_t>(d.rows) * d.cols * sizeof(T));
    return f.Finish(MergeRelease(s, result.Release()));
}

template <class T>
Status Det(Handle a, int32_t type, T* result) {
    Frame f;
    f.Result(reinterpret_cast<double*>(result), sizeof(T) / sizeof(double));
    const Shape d = Dims(a);
    const T* pa = nullptr;
    T value = 0;
    Status s = EmptyThenSquare(d);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) s = Determinant(pa, d.rows, type, &value);
    if (s == 0) std::memcpy(result, &value, sizeof value);
    return f.Finish(s);
}

}  // namespace

// --- SVD route -----------------------------------------------------------------------------------

TW_API int32_t GenLinEqs82_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, double tol, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return LinEqsSvd<double>(a, b, x, tol, host); });
}

TW_API int32_t CxGenLinEqs82_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, double tol, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return LinEqsSvd<cdouble>(a, b, x, tol, host); });
}

TW_API int32_t GenLinEqs_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status) {
    return GenLinEqs82_head(a, b, x, -1.0, status);
}

TW_API int32_t CxGenLinEqs_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status) {
    return CxGenLinEqs82_head(a, b, x, -1.0, status);
}

TW_API int32_t GenLinEqsbySVD2011_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, double tol,
                                       int32_t refinements, Array1DHandle work) {
    return LinEqsWork(a, b, x, tol, refinements, work);
}

TW_API int32_t GenLinEqs2010_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, double tol, Array1DHandle work) {
    return LinEqsWork(a, b, x, tol, 0, work);
}

TW_API int32_t EqsSetBySVDDri82_head(Array2DHandle a, Array2DHandle b, Array2DHandle x, double tol) {
    return SetSvd<double>(a, b, x, tol);
}

TW_API int32_t CxEqsSetBySVDDri82_head(Array2DHandle a, Array2DHandle b, Array2DHandle x, double tol) {
    return SetSvd<cdouble>(a, b, x, tol);
}

TW_API int32_t EqsSetBySVDDri_head(Array2DHandle a, Array2DHandle b, Array2DHandle x) {
    return EqsSetBySVDDri82_head(a, b, x, -1.0);
}

TW_API int32_t CxEqsSetBySVDDri_head(Array2DHandle a, Array2DHandle b, Array2DHandle x) {
    return CxEqsSetBySVDDri82_head(a, b, x, -1.0);
}

// --- LU route ------------------------------------------------------------------------------------

TW_API int32_t EqsByLUDri_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return LinEqsLu<double>(a, b, x, host); });
}

TW_API int32_t CxEqsByLUDri_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return LinEqsLu<cdouble>(a, b, x, host); });
}

TW_API int32_t EqsSetByLUDri_head(Array2DHandle a, Array2DHandle b, Array2DHandle x) { return SetLu<double>(a, b, x); }

TW_API int32_t CxEqsSetByLUDri_head(Array2DHandle a, Array2DHandle b, Array2DHandle x) {
    return SetLu<cdouble>(a, b, x);
}

TW_API int32_t LULinEqs_head(Array2DHandle lu, Array1DHandle perm, Array1DHandle b, int32_t* status) {
    return ToPointer(status, LuLinEqs<double>(lu, perm, b));
}

TW_API int32_t CxLULinEqs_head(Array2DHandle lu, Array1DHandle perm, Array1DHandle b, int32_t* status) {
    return ToPointer(status, LuLinEqs<cdouble>(lu, perm, b));
}

TW_API int32_t InvMatrixLUDri_head(Array2DHandle a, int32_t* status) { return ToPointer(status, InvLuDri<double>(a)); }

TW_API int32_t CxInvMatrixLUDri_head(Array2DHandle a, int32_t* status) {
    return ToPointer(status, InvLuDri<cdouble>(a));
}

TW_API int32_t LUInvMatrix_head(Array2DHandle lu, Array1DHandle perm, int32_t* status) {
    return ToPointer(status, LuInvMatrix<double>(lu, perm));
}

TW_API int32_t CxLUInvMatrix_head(Array2DHandle lu, Array1DHandle perm, int32_t* status) {
    return ToPointer(status, LuInvMatrix<cdouble>(lu, perm));
}

// --- Cholesky route ------------------------------------------------------------------------------

// Only the upper triangle is read.
TW_API int32_t EqsByCholeskyDri_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return LinEqsCholesky<double, false>(a, 1, b, x, host); });
}

TW_API int32_t CxEqsByCholeskyDri_head(Array2DHandle a, Array1DHandle b, Array1DHandle x, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return LinEqsCholesky<cdouble, false>(a, 1, b, x, host); });
}

TW_API int32_t EqsSetByCholeskyDri_head(Array2DHandle a, int32_t triangle, Array2DHandle b, Array2DHandle x) {
    int32_t host = 0;
    return LinEqsCholesky<double, true>(a, triangle, b, x, &host);
}

TW_API int32_t CxEqsSetByCholeskyDri_head(Array2DHandle a, int32_t triangle, Array2DHandle b, Array2DHandle x) {
    int32_t host = 0;
    return LinEqsCholesky<cdouble, true>(a, triangle, b, x, &host);
}

TW_API int32_t CholeskyLinEqs_head(Array1DHandle l, Array1DHandle b, int32_t* status) {
    return ToPointer(status, CholeskyLinEqs<double>(l, b));
}

TW_API int32_t CxCholeskyLinEqs_head(Array1DHandle l, Array1DHandle b, int32_t* status) {
    return ToPointer(status, CholeskyLinEqs<cdouble>(l, b));
}

TW_API int32_t InvMatrixChoDri_head(Array2DHandle a, int32_t* status) { return ToPointer(status, InvChoDri<double>(a)); }

TW_API int32_t CxInvMatrixChoDri_head(Array2DHandle a, int32_t* status) {
    return ToPointer(status, InvChoDri<cdouble>(a));
}

TW_API int32_t Cholesky_InvMatrix_head(Array1DHandle l, int32_t* status) {
    return ToPointer(status, CholeskyInvMatrix<double>(l));
}

TW_API int32_t CxCholesky_InvMatrix_head(Array1DHandle l, int32_t* status) {
    return ToPointer(status, CholeskyInvMatrix<cdouble>(l));
}

// No screen, no resize, and the outputs stand whatever the status. The sizes are the caller's
// promise; a matrix that is not square or work arrays that are too short are refused untouched
// rather than written beyond their ends.
TW_API int32_t PreallocInvMatrixChoDri_H(Array2DHandle a, Array1DHandle work1, Array1DHandle work2) {
    const Shape d = Dims(a);
    const int32_t n = d.rows;
    if (n < 1) return 0;
    if (d.cols != n || static_cast<int64_t>(Count(work1)) < static_cast<int64_t>(n) * (n + 1) / 2 || Count(work2) < n)
        return SizeMismatchErr;
    Frame f;
    double *pa = nullptr, *p1 = nullptr, *p2 = nullptr;
    Status s = f.InPlace2D(a, &pa);
    if (s == 0) s = f.InPlace(work1, &p1);
    if (s == 0) s = f.InPlace(work2, &p2);
    const Status result = s == 0 ? PreallocCholeskyInverse(pa, n, p1, p2) : s;
    // Committed as a success: the matrix holds what the loop made of it, NaN included.
    const Status release = f.Finish(s);
    return result != 0 ? result : release;
}

// --- Triangular route ----------------------------------------------------------------------------

TW_API int32_t TriLinEqs_head(CompactMatrix* t, Array1DHandle b, int32_t* status) {
    return ToPointer(status, TriLinEqs<double>(t, b));
}

TW_API int32_t CxTriLinEqs_head(CompactMatrix* t, Array1DHandle b, int32_t* status) {
    return ToPointer(status, TriLinEqs<cdouble>(t, b));
}

TW_API int32_t TriEqsSetDri_head(Array2DHandle a, int32_t kind, Array2DHandle b, Array2DHandle x) {
    return TriEqsSet<double>(a, kind, b, x);
}

TW_API int32_t CxTriEqsSetDri_head(Array2DHandle a, int32_t kind, Array2DHandle b, Array2DHandle x) {
    return TriEqsSet<cdouble>(a, kind, b, x);
}

TW_API int32_t InvMatrixTriDri_head(Array2DHandle a, int32_t* kind, int32_t* status) {
    return ToPointer(status, InvTriDri<double>(a, *kind));
}

TW_API int32_t CxInvMatrixTriDri_head(Array2DHandle a, int32_t* kind, int32_t* status) {
    return ToPointer(status, InvTriDri<cdouble>(a, *kind));
}

TW_API int32_t Tri_InvMatrix_head(CompactMatrix* t, int32_t* status) {
    return ToPointer(status, TriInvMatrix<double>(t));
}

TW_API int32_t CxTri_InvMatrix_head(CompactMatrix* t, int32_t* status) {
    return ToPointer(status, TriInvMatrix<cdouble>(t));
}

// --- Band and tridiagonal routes -----------------------------------------------------------------

TW_API int32_t BandEqsDriH(Array2DHandle ab, Array1DHandle b, int32_t kl, int32_t ku) {
    return Band<double, false>(ab, b, kl, ku);
}

TW_API int32_t CxBandEqsDriH(Array2DHandle ab, Array1DHandle b, int32_t kl, int32_t ku) {
    return Band<cdouble, false>(ab, b, kl, ku);
}

TW_API int32_t BandEqsSetDriH(Array2DHandle ab, Array2DHandle b, int32_t kl, int32_t ku) {
    return Band<double, true>(ab, b, kl, ku);
}

TW_API int32_t CxBandEqsSetDriH(Array2DHandle ab, Array2DHandle b, int32_t kl, int32_t ku) {
    return Band<cdouble, true>(ab, b, kl, ku);
}

TW_API int32_t TriDiagLU_head(Array1DHandle dl, Array1DHandle d, Array1DHandle du, Array1DHandle du2,
                              Array1DHandle ipiv) {
    return TriDiagLu(dl, d, du, du2, ipiv);
}

TW_API int32_t TriDiagEqsByLU_head(int32_t trans, Array1DHandle dl, Array1DHandle d, Array1DHandle du,
                                   Array1DHandle du2, Array1DHandle ipiv, Array1DHandle b) {
    return TriDiagSolveFrame<false>(trans, dl, d, du, du2, ipiv, b);
}

TW_API int32_t TriDiagEqsSetByLU_head(int32_t trans, Array1DHandle dl, Array1DHandle d, Array1DHandle du,
                                      Array1DHandle du2, Array1DHandle ipiv, Array2DHandle b) {
    return TriDiagSolveFrame<true>(trans, dl, d, du, du2, ipiv, b);
}

// --- Pseudo-inverse and determinant --------------------------------------------------------------

TW_API int32_t PseudoInverse_head(Array2DHandle a, double* tol, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Pinv<double>(a, *tol, host); });
}

TW_API int32_t CxPseudoInverse_head(Array2DHandle a, double* tol, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Pinv<cdouble>(a, *tol, host); });
}

TW_API int32_t Determinant_head(Array2DHandle a, MatrixType* type, double* result, int32_t* status) {
    return ToPointer(status, Det<double>(a, *type, result));
}

TW_API int32_t CxDeterminant_head(Array2DHandle a, MatrixType* type, ComplexDouble* result, int32_t* status) {
    return ToPointer(status, Det<cdouble>(a, *type, reinterpret_cast<cdouble*>(result)));
}
