// Decompositions that LAPACK computes on a transposing copy: Hessenberg reduction, balancing and
// the generalised SVD.
#include <algorithm>
#include <cstring>

#include "frame/frame.hpp"
#include "matrix/decompose.hpp"
#include "matrix/lapack.hpp"

namespace tw {

namespace {

size_t Product(int32_t a, int32_t b) { return static_cast<size_t>(a) * static_cast<size_t>(b); }

// c = a b^H for column-major n by n operands (b^T for real data).
void TimesTransposed(const double* a, const double* b, int32_t n, double* c) {
    cblas_dgemm(CblasColMajor, CblasNoTrans, CblasTrans, n, n, n, 1.0, a, n, b, n, 0.0, c, n);
}
void TimesTransposed(const cdouble* a, const cdouble* b, int32_t n, cdouble* c) {
    const cdouble one = 1.0, zero = 0.0;
    cblas_zgemm(CblasColMajor, CblasNoTrans, CblasConjTrans, n, n, n, &one, a, n, b, n, &zero, c, n);
}

}  // namespace

template <class T> Status HessenbergReduce(T* a, int32_t n, int32_t ilo, int32_t ihi, T* q) {
    const size_t nn = Product(n, n);
    Scratch<T> buffer, tau;
    if (buffer.Allocate(nn) != 0 || tau.Allocate(static_cast<size_t>(std::max(n - 1, 1))) != 0) return OutOfMemoryErr;
    T* b = buffer.get();
    Status s = TransposeMatrix<T>(a, n, n, b);
    if (s == 0) s = Gehrd<T>(n, ilo + 1, ihi + 1, b, n, tau.get());
    if (s == 0) {
        // Only the Hessenberg part: the reflectors below the subdiagonal stay behind.
        std::fill(a, a + nn, T(0));
        for (int32_t j = 0; j < n; ++j)
            for (int32_t i = 0; i < std::min(j + 2, n); ++i) a[Product(i, n) + j] = b[Product(j, n) + i];
        s = Orghr<T>(n, ilo + 1, ihi + 1, b, n, tau.get());
    }
    if (s == 0) s = TransposeMatrix<T>(b, n, n, q);
    return MergeRelease(MergeRelease(s, buffer.Release()), tau.Release());
}

template <class T>
Status MatrixBalance(T* a, int32_t n, int32_t job, int32_t* ilo, int32_t* ihi, double* scale) {
    static constexpr char kJobs[] = {'N', 'P', 'S', 'B'};
    if (static_cast<uint32_t>(job) > 3) return InvalidSelectorErr;
    Scratch<T> buffer;
    if (buffer.Allocate(Product(n, n)) != 0) return OutOfMemoryErr;
    Status s = TransposeMatrix<T>(a, n, n, buffer.get());
    int lo = 0, hi = 0;
    if (s == 0) s = Gebal<T>(kJobs[job], n, buffer.get(), n, &lo, &hi, scale);
    if (s == 0) s = TransposeMatrix<T>(buffer.get(), n, n, a);
    if (s == 0) *ilo = lo - 1, *ihi = hi - 1;
    return MergeRelease(s, buffer.Release());
}

template <class T>
Status GeneralisedSvd(const T* a, int32_t m, int32_t n, const T* b, int32_t p, int32_t vectors, int32_t full, double* s,
                      T* u, T* v, T* q, T* d1, T* d2) {
    if (Screen(a, m * n) || Screen(b, p * n)) return NanInfErr;
    const size_t nn = Product(n, n);
    // Column-major copies of A and B, the three square factors, [0 R], their product, alpha, beta.
    const size_t size = Product(m, n) + Product(p, n) + (vectors ? Product(m, m) + Product(p, p) + 3 * nn : 0);
    Scratch<T> work;
    Scratch<double> values;
    if (work.Allocate(size) != 0 || values.Allocate(2 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    T* ca = work.get();
    T* cb = ca + Product(m, n);
    T* fu = cb + Product(p, n);
    T* fv = fu + Product(m, m);
    T* fq = fv + Product(p, p);
    T* rr = fq + nn;
    T* prod = rr + nn;
    double* alpha = values.get();
    double* beta = alpha + n;
    Status st = TransposeMatrix<T>(const_cast<T*>(a), m, n, ca);
    if (st == 0) st = TransposeMatrix<T>(const_cast<T*>(b), p, n, cb);
    int k = 0, l = 0;
    if (st == 0)
        st = Ggsvd<T>(vectors != 0, m, n, p, &k, &l, ca, m, cb, p, alpha, beta, vectors ? fu : nullptr, std::max(m, 1),
                      vectors ? fv : nullptr, std::max(p, 1), vectors ? fq : nullptr, std::max(n, 1));
    if (st == 0)
        for (int32_t i = 0; i < n; ++i) s[i] = alpha[i] / beta[i];
    if (st == 0 && vectors) {
        const int32_t uCols = full != 0 ? m : std::min(m, n), vCols = full != 0 ? p : std::min(p, n);
        // The leading columns of a column-major factor are the leading rows of its transpose.
        st = TransposeMatrix<T>(fu, uCols, m, u);
        if (st == 0) st = TransposeMatrix<T>(fv, vCols, p, v);
        std::fill(d1, d1 + Product(uCols, n), T(0));
        for (int32_t i = 0; i < std::min(k + l, m); ++i) d1[Product(i, n) + i] = alpha[i];
        std::fill(d2, d2 + Product(vCols, n), T(0));
        for (int32_t i = k; i < k + l; ++i) d2[Product(i - k, n) + i] = beta[i];
        // [0 R] in the last k + l columns of the first k + l rows; rows beyond m of R are left in B.
        std::fill(rr, rr + nn, T(0));
        const int32_t c0 = n - k - l;
        for (int32_t i = 0; i < k + l; ++i)
            for (int32_t j = c0 + i; j < n; ++j)
                rr[Product(j, n) + i] = i < m ? ca[Product(j, m) + i] : cb[Product(j, p) + i - k];
        TimesTransposed(rr, fq, n, prod);
        if (st == 0) st = TransposeMatrix<T>(prod, n, n, q);
    }
    return MergeRelease(MergeRelease(st, work.Release()), values.Release());
}

#define TW_REDUCTIONS(T)                                                                                        \
    template Status HessenbergReduce<T>(T*, int32_t, int32_t, int32_t, T*);                                     \
    template Status MatrixBalance<T>(T*, int32_t, int32_t, int32_t*, int32_t*, double*);                        \
    template Status GeneralisedSvd<T>(const T*, int32_t, int32_t, const T*, int32_t, int32_t, int32_t, double*, \
                                      T*, T*, T*, T*, T*);
TW_REDUCTIONS(double)
TW_REDUCTIONS(cdouble)
#undef TW_REDUCTIONS

}  // namespace tw
