// Frames of the decompositions: LU, Cholesky, QR, SVD, generalised SVD, Hessenberg, balancing and
// the compact conversions.
#include <algorithm>
#include <cstring>

#include "matrix/decompose.hpp"
#include "matrix/matrix_frame.hpp"
#include "matrix/solve.hpp"
#include "twanlys/matrix.h"

using namespace tw;

namespace {

template <class T>
Status Lu(Handle& a, Handle& perm, int32_t* parity, int32_t* host) {
    Frame f;
    f.Output<int32_t>(perm);
    const Shape d = Dims(a);
    T* pa = nullptr;
    int32_t* pp = nullptr;
    Status s = (d.rows < 1 || d.cols < 1) ? EmptyArrayErr : 0;
    if (s == 0) s = Out1D(f, perm, d.rows, &pp, host);
    const Status view = f.InPlace2D(a, &pa);
    if (s == 0) s = view;
    if (s == 0) s = LuFactor(pa, d.rows, d.cols, pp, parity);
    return f.Finish(s);
}

// Householder for method 0 (and always for complex data), Givens 1, fast Givens 2.
template <class T>
Status Qrd(Handle a, int32_t method, Handle& q, Handle& r, int32_t* host) {
    Frame f;
    f.Output2D<T>(q);
    f.Output2D<T>(r);
    const Shape d = Dims(a);
    const T* pa = nullptr;
    T *pq = nullptr, *pr = nullptr;
    Status s = (d.rows < 1 || d.cols < 1) ? EmptyArrayErr : static_cast<uint32_t>(method) > 2 ? InvalidSelectorErr : 0;
    if (s == 0) s = Out2D(f, q, d.rows, d.rows, &pq, host);
    if (s == 0) s = Out2D(f, r, d.rows, d.cols, &pr, host);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) {
        if constexpr (kIsComplex<T>)
            s = QrHouseholder(pa, d.rows, d.cols, 0, pq, pr);
        else
            s = method == 1   ? QrGivens(pa, d.rows, d.cols, pq, pr)
                : method == 2 ? QrFastGivens(pa, d.rows, d.cols, pq, pr)
                              : QrHouseholder(pa, d.rows, d.cols, 0, pq, pr);
    }
    return f.Finish(s);
}

// Pivoted QR, or Householder QR with an empty P when pivot is 0.
template <class T>
Status QrDec(Handle a, int32_t pivot, int32_t option, Handle& p, Handle& q, Handle& r) {
    Frame f;
    f.Output2D<int32_t>(p);
    f.Output2D<T>(q);
    f.Output2D<T>(r);
    const Shape d = Dims(a);
    const int32_t m = d.rows, n = d.cols;
    int32_t qRows = 0, qCols = 0, rRows = 0, host = 0;
    const T* pa = nullptr;
    T *pq = nullptr, *pr = nullptr;
    int32_t* pp = nullptr;
    Scratch<int32_t> perm;
    Status s = (m < 1 || n < 1) ? EmptyArrayErr : static_cast<uint32_t>(option) > 2 ? InvalidSelectorErr : 0;
    if (s == 0) QrShape(m, n, option, &qRows, &qCols, &rRows);
    const int32_t pSide = pivot != 0 ? n : 0;
    if (s == 0) s = Out2D(f, p, pSide, pSide, &pp, &host);
    if (s == 0) s = Out2D(f, q, qRows, qCols, &pq, &host);
    if (s == 0) s = Out2D(f, r, rRows, n, &pr, &host);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0 && pivot == 0) s = QrHouseholder(pa, m, n, option, pq, pr);
    if (s == 0 && pivot != 0) {
        s = perm.Allocate(static_cast<size_t>(n));
        if (s == 0) s = QrPivoted(pa, m, n, option, perm.get(), pq, pr);
        if (s == 0) {
            std::fill(pp, pp + static_cast<size_t>(n) * n, 0);
            for (int32_t i = 0; i < n; ++i) pp[static_cast<size_t>(perm[i]) * n + i] = 1;
        }
    }
    return f.Finish(MergeRelease(s, perm.Release()));
}

template <class T>
Status Cholesky(Handle& c) {
    Frame f;
    const int32_t length = Count(c);
    int32_t n = 0;
    T* pc = nullptr;
    Status s = length < 1 ? EmptyArrayErr : CompactOrder(length, &n);
    const Status view = f.InPlace(c, &pc);
    if (s == 0) s = view;
    if (s == 0) s = CholeskyFactor(pc, n);
    return f.Finish(s);
}

template <class T>
Status FullCholeskyFrame(Handle& a) {
    Frame f;
    const Shape d = Dims(a);
    T* pa = nullptr;
    Status s = d.rows != d.cols ? NotSquareErr : d.rows < 1 ? EmptyArrayErr : 0;
    const Status view = f.InPlace2D(a, &pa);
    if (s == 0) s = view;
    if (s == 0) s = FullCholesky(pa, d.rows);
    return f.Finish(s);
}

template <class T>
Status Gsvd(Handle a, Handle b, int32_t valuesOnly, int32_t full, Handle& s, Handle& u, Handle& v, Handle& q,
            Handle& d1, Handle& d2) {
    Frame f;
    f.Output<double>(s);
    for (Handle* h : {&u, &v, &q, &d1, &d2}) f.Output2D<T>(*h);
    const Shape da = Dims(a), db = Dims(b);
    const int32_t m = da.rows, n = da.cols, p = db.rows;
    const bool vectors = valuesOnly == 0;
    const int32_t uCols = full != 0 ? m : std::min(m, n), vCols = full != 0 ? p : std::min(p, n);
    int32_t host = 0;
    const T *pa = nullptr, *pb = nullptr;
    double* ps = nullptr;
    T *pu = nullptr, *pv = nullptr, *pq = nullptr, *pd1 = nullptr, *pd2 = nullptr;
    Status st = da.cols != db.cols ? BandStructureErr : (m < 1 || n < 1 || p < 1) ? EmptyArrayErr : 0;
    if (st == 0) st = Out1D(f, s, n, &ps, &host);
    if (st == 0) st = Out2D(f, u, vectors ? m : 0, vectors ? uCols : 0, &pu, &host);
    if (st == 0) st = Out2D(f, v, vectors ? p : 0, vectors ? vCols : 0, &pv, &host);
    if (st == 0) st = Out2D(f, q, vectors ? n : 0, vectors ? n : 0, &pq, &host);
    if (st == 0) st = Out2D(f, d1, vectors ? uCols : 0, vectors ? n : 0, &pd1, &host);
    if (st == 0) st = Out2D(f, d2, vectors ? vCols : 0, vectors ? n : 0, &pd2, &host);
    if (st == 0) st = f.In2D(a, &pa);
    if (st == 0) st = f.In2D(b, &pb);
    if (st == 0) st = GeneralisedSvd(pa, m, n, pb, p, vectors ? 1 : 0, full, ps, pu, pv, pq, pd1, pd2);
    return f.Finish(st);
}

template <class T>
Status Hessenberg(Handle& a, int32_t ilo, int32_t ihi, Handle& q) {
    Frame f;
    f.Output2D<T>(q);
    const Shape d = Dims(a);
    const int32_t n = d.rows;
    int32_t host = 0;
    T *pa = nullptr, *pq = nullptr;
    Status s = d.rows != d.cols ? NotSquareErr : n < 1 ? EmptyArrayErr
               : (ilo < 0 || ihi >= n || ihi < ilo) ? IndexRangeErr : 0;
    const Status view = f.InPlace2D(a, &pa);
    if (s == 0) s = view;
    if (s == 0) s = Out2D(f, q, n, n, &pq, &host);
    if (s == 0) s = HessenbergReduce(pa, n, ilo, ihi, pq);
    return f.Finish(s);
}

template <class T>
Status Balance(Handle& a, int32_t job, int32_t* ilo, int32_t* ihi, Handle& scale) {
    Frame f;
    f.Output<double>(scale);
    const Shape d = Dims(a);
    const int32_t n = d.rows;
    int32_t host = 0;
    T* pa = nullptr;
    double* ps = nullptr;
    Status s = (d.rows < 1 || d.cols < 1) ? EmptyArrayErr : d.rows != d.cols ? NotSquareErr : 0;
    const Status view = f.InPlace2D(a, &pa);
    if (s == 0) s = view;
    if (s == 0) s = Out1D(f, scale, n, &ps, &host);
    if (s == 0) s = MatrixBalance(pa, n, job, ilo, ihi, ps);
    return f.Finish(s);
}

// Singular values as f64, or as complex elements with zero imaginary parts.
template <class S>
void StoreValues(const double* values, int32_t r, S* out) {
    for (int32_t i = 0; i < r; ++i) out[i] = values[i];
}

// The SVD frames: u null means that A itself becomes U.
template <class T, class S>
Status Svd(Handle& a, int32_t full, Handle* u, Handle& s, Handle* v, int32_t* host) {
    Frame f;
    if (u != nullptr) f.Output2D<T>(*u);
    if (u == nullptr && v != nullptr) f.Output2D<T>(a);
    f.Output<S>(s);
    if (v != nullptr) f.Output2D<T>(*v);
    const Shape d = Dims(a);
    const int32_t m = d.rows, n = d.cols, r = std::min(m, n);
    const bool vectors = v != nullptr;
    const int32_t uCols = full != 0 ? m : r, vCols = full != 0 ? n : r;
    const T* pa = nullptr;
    Scratch<T> fu, fv;
    Scratch<double> values;
    Status st = (m < 1 || n < 1) ? EmptyArrayErr : f.In2D(a, &pa);
    if (st == 0 && values.Allocate(static_cast<size_t>(r)) != 0) st = OutOfMemoryErr;
    if (st == 0 && vectors &&
        (fu.Allocate(static_cast<size_t>(m) * uCols) != 0 || fv.Allocate(static_cast<size_t>(n) * vCols) != 0))
        st = OutOfMemoryErr;
    if (st == 0) st = FullSvd<T>(pa, m, n, fu.get(), values.get(), fv.get(), full);
    T *pu = nullptr, *pv = nullptr;
    S* ps = nullptr;
    if (st == 0 && vectors) st = Out2D(f, u != nullptr ? *u : a, m, uCols, &pu, host);
    if (st == 0) st = Out1D(f, s, r, &ps, host);
    if (st == 0 && vectors) st = Out2D(f, *v, n, vCols, &pv, host);
    if (st == 0) {
        StoreValues(values.get(), r, ps);
        if (vectors) {
            std::memcpy(pu, fu.get(), static_cast<size_t>(m) * uCols * sizeof(T));
            std::memcpy(pv, fv.get(), static_cast<size_t>(n) * vCols * sizeof(T));
        }
    }
    st = MergeRelease(MergeRelease(MergeRelease(st, fu.Release()), fv.Release()), values.Release());
    return f.Finish(st);
}

template <class T>
Status ToCompact(Handle a, int32_t kind, Handle& out, int32_t* host) {
    Frame f;
    f.Output<T>(out);
    const Shape d = Dims(a);
    const T* pa = nullptr;
    T* po = nullptr;
    Status s = static_cast<uint32_t>(kind) > 2             ? InvalidSelectorErr
               : (d.rows < 1 || d.cols < 1)                ? EmptyArrayErr
               : d.rows != d.cols                           ? NotSquareErr
                                                            : 0;
    if (s == 0) s = Out1D(f, out, d.rows * (d.rows + 1) / 2, &po, host);
    if (s == 0) s = f.In2D(a, &pa);
    if (s == 0) PackCompact(pa, d.rows, kind, po);
    return f.Finish(s);
}

template <class T>
Status FromCompact(const CompactMatrix* c, Handle& m, int32_t* host) {
    Frame f;
    f.Output2D<T>(m);
    const int32_t length = Count(c->data);
    int32_t n = 0;
    const T* pc = nullptr;
    T* pm = nullptr;
    Status s = static_cast<uint32_t>(c->kind) > 2 ? InvalidSelectorErr : length < 1 ? EmptyArrayErr : 0;
    if (s == 0) s = CompactOrder(length, &n);
    if (s == 0) s = Out2D(f, m, n, n, &pm, host);
    if (s == 0) s = f.In(c->data, &pc);
    if (s == 0) ExpandCompact(pc, n, c->kind, pm);
    return f.Finish(s);
}

}  // namespace

TW_API int32_t LU_head(Array2DHandle a, Array1DHandle perm, int32_t* parity, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Lu<double>(a, perm, parity, host); });
}

TW_API int32_t CxLU_head(Array2DHandle a, Array1DHandle perm, int32_t* parity, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Lu<cdouble>(a, perm, parity, host); });
}

TW_API int32_t qrd_head(Array2DHandle a, QrdMethod* method, Array2DHandle q, Array2DHandle r, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Qrd<double>(a, *method, q, r, host); });
}

// The method is not read: complex QR is always Householder.
TW_API int32_t Cxqrd_head(Array2DHandle a, QrdMethod*, Array2DHandle q, Array2DHandle r, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Qrd<cdouble>(a, 0, q, r, host); });
}

TW_API int32_t QRDecH(Array2DHandle a, int32_t pivot, QrOption option, Array2DHandle p, Array2DHandle q,
                      Array2DHandle r) {
    return QrDec<double>(a, pivot, option, p, q, r);
}

TW_API int32_t CxQRDecH(Array2DHandle a, int32_t pivot, QrOption option, Array2DHandle p, Array2DHandle q,
                        Array2DHandle r) {
    return QrDec<cdouble>(a, pivot, option, p, q, r);
}

TW_API int32_t Cholesky_head(Array1DHandle compact, int32_t* status) {
    return ToPointer(status, Cholesky<double>(compact));
}

TW_API int32_t CxCholesky_head(Array1DHandle compact, int32_t* status) {
    return ToPointer(status, Cholesky<cdouble>(compact));
}

TW_API int32_t FullCholesky_head(Array2DHandle a, int32_t* status) {
    const Status s = FullCholeskyFrame<double>(a);
    ToPointer(status, s);
    return s;
}

TW_API int32_t CxFullCholesky_head(Array2DHandle a, int32_t* status) {
    const Status s = FullCholeskyFrame<cdouble>(a);
    ToPointer(status, s);
    return s;
}

TW_API int32_t GSVD_head(Array2DHandle a, Array2DHandle b, int32_t valuesOnly, int32_t full, Array1DHandle s,
                         Array2DHandle u, Array2DHandle v, Array2DHandle q, Array2DHandle d1, Array2DHandle d2) {
    return Gsvd<double>(a, b, valuesOnly, full, s, u, v, q, d1, d2);
}

TW_API int32_t CxGSVD_head(Array2DHandle a, Array2DHandle b, int32_t valuesOnly, int32_t full, Array1DHandle s,
                           Array2DHandle u, Array2DHandle v, Array2DHandle q, Array2DHandle d1, Array2DHandle d2) {
    return Gsvd<cdouble>(a, b, valuesOnly, full, s, u, v, q, d1, d2);
}

TW_API int32_t Hessenberg_head(Array2DHandle a, int32_t ilo, int32_t ihi, Array2DHandle q) {
    return Hessenberg<double>(a, ilo, ihi, q);
}

TW_API int32_t CxHessenberg_head(Array2DHandle a, int32_t ilo, int32_t ihi, Array2DHandle q) {
    return Hessenberg<cdouble>(a, ilo, ihi, q);
}

TW_API int32_t MatrixBalance_head(Array2DHandle a, BalanceJob job, int32_t* ilo, int32_t* ihi, Array1DHandle scale) {
    return Balance<double>(a, job, ilo, ihi, scale);
}

TW_API int32_t CxMatrixBalance_head(Array2DHandle a, BalanceJob job, int32_t* ilo, int32_t* ihi, Array1DHandle scale) {
    return Balance<cdouble>(a, job, ilo, ihi, scale);
}

TW_API int32_t SVD_head(Array2DHandle a, Array1DHandle s, Array2DHandle v, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Svd<double, double>(a, 0, nullptr, s, &v, host); });
}

TW_API int32_t CxSVD_head(Array2DHandle a, Array1DHandle s, Array2DHandle v, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Svd<cdouble, cdouble>(a, 0, nullptr, s, &v, host); });
}

TW_API int32_t SVDEx_head(Array2DHandle a, int32_t full, Array2DHandle u, Array1DHandle s, Array2DHandle v) {
    int32_t host = 0;
    return Svd<double, double>(a, full, &u, s, &v, &host);
}

TW_API int32_t CxSVDEx_head(Array2DHandle a, int32_t full, Array2DHandle u, Array1DHandle s, Array2DHandle v) {
    int32_t host = 0;
    return Svd<cdouble, double>(a, full, &u, s, &v, &host);
}

TW_API int32_t SVDS_head(Array2DHandle a, Array1DHandle s, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Svd<double, double>(a, 0, nullptr, s, nullptr, host); });
}

TW_API int32_t CxSVDS_head(Array2DHandle a, Array1DHandle s, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return Svd<cdouble, double>(a, 0, nullptr, s, nullptr, host); });
}

TW_API int32_t Matrix_to_Compact_head(Array2DHandle a, int32_t* kind, Array1DHandle out, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return ToCompact<double>(a, *kind, out, host); });
}

TW_API int32_t CxMatrix_to_Compact_head(Array2DHandle a, int32_t* kind, Array1DHandle out, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return ToCompact<cdouble>(a, *kind, out, host); });
}

TW_API int32_t Compact_to_Matrix_head(CompactMatrix* compact, Array2DHandle m, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return FromCompact<double>(compact, m, host); });
}

TW_API int32_t CxCompact_to_Matrix_head(CompactMatrix* compact, Array2DHandle m, int32_t* status) {
    return PointerStyle(status, [&](int32_t* host) { return FromCompact<cdouble>(compact, m, host); });
}

// No checks, no resize, no status: the caller has sized both blocks. The element data are copied
// through aligned scratch because host blocks may be poorly aligned.
TW_API int32_t MatrixToCompact_H(Array2DHandle a, Array1DHandle compact) {
    const int32_t n = Dims(a).rows;
    if (n < 1) return 0;
    Scratch<double> m, c;
    if (m.Allocate(static_cast<size_t>(n) * n) != 0 || c.Allocate(static_cast<size_t>(n) * (n + 1) / 2) != 0) return 0;
    std::memcpy(m.get(), static_cast<unsigned char*>(*a) + 8, static_cast<size_t>(n) * n * sizeof(double));
    PackCompact(m.get(), n, 0, c.get());
    std::memcpy(static_cast<unsigned char*>(*compact) + 4, c.get(), static_cast<size_t>(n) * (n + 1) / 2 * sizeof(double));
    return 0;
}

TW_API int32_t CompactToMatrix_H(Array2DHandle m, Array1DHandle compact) {
    const int32_t n = Dims(m).rows;
    if (n < 1) return 0;
    Scratch<double> full, c;
    if (full.Allocate(static_cast<size_t>(n) * n) != 0 || c.Allocate(static_cast<size_t>(n) * (n + 1) / 2) != 0) return 0;
    std::memcpy(c.get(), static_cast<unsigned char*>(*compact) + 4, static_cast<size_t>(n) * (n + 1) / 2 * sizeof(double));
    ExpandCompact(c.get(), n, 2, full.get());
    std::memcpy(static_cast<unsigned char*>(*m) + 8, full.get(), static_cast<size_t>(n) * n * sizeof(double));
    return 0;
}
