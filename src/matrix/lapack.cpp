#include "matrix/lapack.hpp"

#include <cstdarg>
#include <cstdio>
#include <algorithm>
#include <cmath>
#include <complex>
#include <cstring>
#include <type_traits>

#include "frame/frame.hpp"
#include "twanlys/matrix.h"

namespace tw {

namespace {

template <class T> inline constexpr bool kIsComplexLapack = !std::is_same_v<T, double>;

enum class When { Negative, Positive, NonZero, OneToN, NPlus1, NPlus2, One };

struct InfoRule {
    Lapack routine;
    When when;
    Status status;
};

// Rules are tried in order; the first that matches decides. A routine with no matching rule
// (or not listed) passes through as 0: its arguments are correct by construction.
constexpr InfoRule kRules[] = {
    {Lapack::Gees, When::Negative, InternalErr},
    {Lapack::Gees, When::OneToN, NoConvergenceErr},
    {Lapack::Gees, When::NPlus1, FactorisationFailedErr},
    {Lapack::Gees, When::NPlus2, FactorisationFailed2Err},
    {Lapack::Gges, When::Negative, InternalErr},
    {Lapack::Gges, When::Positive, NoConvergenceErr},
    {Lapack::Hgeqz, When::Negative, InternalErr},
    {Lapack::Hgeqz, When::Positive, NoConvergenceErr},
    {Lapack::Tgexc, When::Negative, InternalErr},
    {Lapack::Tgexc, When::One, FactorisationFailedErr},
    {Lapack::Tgevc, When::NonZero, InternalErr},
    {Lapack::Ggsvd, When::Negative, InternalErr},
    {Lapack::Ggsvd, When::One, NoConvergenceErr},
    {Lapack::Gebal, When::NonZero, InternalErr},
    {Lapack::Gbsv, When::Positive, SingularMatrixErr},
    {Lapack::Gttrf, When::Positive, SingularPivotWarn},
    {Lapack::Gelsd, When::Negative, InternalErr},
    {Lapack::Gelsd, When::Positive, NoConvergenceErr},
    {Lapack::Trsyl, When::Negative, InternalErr},
};

bool Matches(When when, int info, int n) {
    switch (when) {
        case When::Negative: return info < 0;
        case When::Positive: return info > 0;
        case When::NonZero: return info != 0;
        case When::OneToN: return info >= 1 && info <= n;
        case When::NPlus1: return info == n + 1;
        case When::NPlus2: return info == n + 2;
        case When::One: return info == 1;
    }
    return false;
}

void Report(const char* name, int parameter) {
    std::fprintf(stderr, "** On entry to %6s, parameter number %2i had an illegal value\n", name, parameter);
}

}  // namespace

namespace {

void Lqf(int m, int n, double* a, int lda, double* tau, double* work, int lwork, int* info) {
    dgelqf_(&m, &n, a, &lda, tau, work, &lwork, info);
}
void Lqf(int m, int n, cdouble* a, int lda, cdouble* tau, cdouble* work, int lwork, int* info) {
    zgelqf_(&m, &n, a, &lda, tau, work, &lwork, info);
}
void Glq(int m, int n, int k, double* a, int lda, const double* tau, double* work, int lwork, int* info) {
    dorglq_(&m, &n, &k, a, &lda, tau, work, &lwork, info);
}
void Glq(int m, int n, int k, cdouble* a, int lda, const cdouble* tau, cdouble* work, int lwork, int* info) {
    zunglq_(&m, &n, &k, a, &lda, tau, work, &lwork, info);
}

// The driver called twice: first for its workspace size (work[0], truncated), then for the work.
template <class T, class Call>
Status WithWorkspace(Call call) {
    T size = 0;
    int info = 0;
    call(&size, -1, &info);
    const int lwork = std::max(1, static_cast<int>(std::real(size)));
    Scratch<T> work;
    if (work.Allocate(static_cast<size_t>(lwork)) != 0) return OutOfMemoryErr;
    call(work.get(), lwork, &info);
    return work.Release();
}

void Qp3(int m, int n, double* a, int lda, int* jpvt, double* tau, double* work, int lwork, double*, int* info) {
    dgeqp3_(&m, &n, a, &lda, jpvt, tau, work, &lwork, info);
}
void Qp3(int m, int n, cdouble* a, int lda, int* jpvt, cdouble* tau, cdouble* work, int lwork, double* rwork,
         int* info) {
    zgeqp3_(&m, &n, a, &lda, jpvt, tau, work, &lwork, rwork, info);
}
void Gqr(int m, int n, int k, double* a, int lda, const double* tau, double* work, int lwork, int* info) {
    dorgqr_(&m, &n, &k, a, &lda, tau, work, &lwork, info);
}
void Gqr(int m, int n, int k, cdouble* a, int lda, const cdouble* tau, cdouble* work, int lwork, int* info) {
    zungqr_(&m, &n, &k, a, &lda, tau, work, &lwork, info);
}
void Hrd(int n, int lo, int hi, double* a, int lda, double* tau, double* work, int lwork, int* info) {
    dgehrd_(&n, &lo, &hi, a, &lda, tau, work, &lwork, info);
}
void Hrd(int n, int lo, int hi, cdouble* a, int lda, cdouble* tau, cdouble* work, int lwork, int* info) {
    zgehrd_(&n, &lo, &hi, a, &lda, tau, work, &lwork, info);
}
void Ghr(int n, int lo, int hi, double* a, int lda, const double* tau, double* work, int lwork, int* info) {
    dorghr_(&n, &lo, &hi, a, &lda, tau, work, &lwork, info);
}
void Ghr(int n, int lo, int hi, cdouble* a, int lda, const cdouble* tau, cdouble* work, int lwork, int* info) {
    zunghr_(&n, &lo, &hi, a, &lda, tau, work, &lwork, info);
}
void Bal(const char* job, int n, double* a, int lda, int* ilo, int* ihi, double* scale, int* info) {
    dgebal_(job, &n, a, &lda, ilo, ihi, scale, info, 1);
}
void Bal(const char* job, int n, cdouble* a, int lda, int* ilo, int* ihi, double* scale, int* info) {
    zgebal_(job, &n, a, &lda, ilo, ihi, scale, info, 1);
}
void Gsv(const char* jobs, int m, int n, int p, int* k, int* l, double* a, int lda, double* b, int ldb, double* alpha,
         double* beta, double* u, int ldu, double* v, int ldv, double* q, int ldq, double* work, double*, int* iwork,
         int* info) {
    dggsvd_(jobs, jobs + 1, jobs + 2, &m, &n, &p, k, l, a, &lda, b, &ldb, alpha, beta, u, &ldu, v, &ldv, q, &ldq,
            work, iwork, info, 1, 1, 1);
}
void Gsv(const char* jobs, int m, int n, int p, int* k, int* l, cdouble* a, int lda, cdouble* b, int ldb,
         double* alpha, double* beta, cdouble* u, int ldu, cdouble* v, int ldv, cdouble* q, int ldq, cdouble* work,
         double* rwork, int* iwork, int* info) {
    zggsvd_(jobs, jobs + 1, jobs + 2, &m, &n, &p, k, l, a, &lda, b, &ldb, alpha, beta, u, &ldu, v, &ldv, q, &ldq,
            work, rwork, iwork, info, 1, 1, 1);
}
void Gbs(int n, int kl, int ku, int nrhs, double* ab, int ldab, int* ipiv, double* b, int ldb, int* info) {
    dgbsv_(&n, &kl, &ku, &nrhs, ab, &ldab, ipiv, b, &ldb, info);
}
void Gbs(int n, int kl, int ku, int nrhs, cdouble* ab, int ldab, int* ipiv, cdouble* b, int ldb, int* info) {
    zgbsv_(&n, &kl, &ku, &nrhs, ab, &ldab, ipiv, b, &ldb, info);
}

}  // namespace

template <class T> Status Gelqf(int m, int n, T* a, int lda, T* tau) {
    return WithWorkspace<T>([&](T* w, int lw, int* info) { Lqf(m, n, a, lda, tau, w, lw, info); });
}

template <class T> Status Orglq(int m, int n, int k, T* a, int lda, const T* tau) {
    return WithWorkspace<T>([&](T* w, int lw, int* info) { Glq(m, n, k, a, lda, tau, w, lw, info); });
}

template <class T> Status Geqp3(int m, int n, T* a, int lda, int* jpvt, T* tau) {
    Scratch<double> rwork;
    if (kIsComplexLapack<T> && rwork.Allocate(2 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    const Status s = WithWorkspace<T>([&](T* w, int lw, int* info) { Qp3(m, n, a, lda, jpvt, tau, w, lw, rwork.get(), info); });
    return MergeRelease(s, rwork.Release());
}

template <class T> Status Orgqr(int m, int n, int k, T* a, int lda, const T* tau) {
    return WithWorkspace<T>([&](T* w, int lw, int* info) { Gqr(m, n, k, a, lda, tau, w, lw, info); });
}

template <class T> Status Gehrd(int n, int ilo, int ihi, T* a, int lda, T* tau) {
    return WithWorkspace<T>([&](T* w, int lw, int* info) { Hrd(n, ilo, ihi, a, lda, tau, w, lw, info); });
}

template <class T> Status Orghr(int n, int ilo, int ihi, T* a, int lda, const T* tau) {
    return WithWorkspace<T>([&](T* w, int lw, int* info) { Ghr(n, ilo, ihi, a, lda, tau, w, lw, info); });
}

template <class T> Status Gebal(char job, int n, T* a, int lda, int* ilo, int* ihi, double* scale) {
    int info = 0;
    Bal(&job, n, a, lda, ilo, ihi, scale, &info);
    return LapackStatus(Lapack::Gebal, info, n);
}

template <class T>
Status Ggsvd(bool vectors, int m, int n, int p, int* k, int* l, T* a, int lda, T* b, int ldb, double* alpha,
             double* beta, T* u, int ldu, T* v, int ldv, T* q, int ldq) {
    const char jobs[3] = {vectors ? 'U' : 'N', vectors ? 'V' : 'N', vectors ? 'Q' : 'N'};
    Scratch<T> work;
    Scratch<double> rwork;
    Scratch<int> iwork;
    if (work.Allocate(static_cast<size_t>(std::max({3 * n, m, p}) + n)) != 0 ||
        iwork.Allocate(static_cast<size_t>(n)) != 0 ||
        (kIsComplexLapack<T> && rwork.Allocate(2 * static_cast<size_t>(n)) != 0))
        return OutOfMemoryErr;
    int info = 0;
    Gsv(jobs, m, n, p, k, l, a, lda, b, ldb, alpha, beta, u, ldu, v, ldv, q, ldq, work.get(), rwork.get(),
        iwork.get(), &info);
    const Status s = MergeRelease(LapackStatus(Lapack::Ggsvd, info, n), work.Release());
    return MergeRelease(MergeRelease(s, rwork.Release()), iwork.Release());
}

template <class T> Status Gbsv(int n, int kl, int ku, int nrhs, T* ab, int ldab, int* ipiv, T* b, int ldb) {
    int info = 0;
    Gbs(n, kl, ku, nrhs, ab, ldab, ipiv, b, ldb, &info);
    return LapackStatus(Lapack::Gbsv, info, n);
}

Status Gttrf(int n, double* dl, double* d, double* du, double* du2, int* ipiv) {
    int info = 0;
    dgttrf_(&n, dl, d, du, du2, ipiv, &info);
    return LapackStatus(Lapack::Gttrf, info, n);
}

Status Gttrs(char trans, int n, int nrhs, const double* dl, const double* d, const double* du, const double* du2,
             const int* ipiv, double* b, int ldb) {
    int info = 0;
    dgttrs_(&trans, &n, &nrhs, dl, d, du, du2, ipiv, b, &ldb, &info, 1);
    return 0;
}

namespace {

// The two calls of a driver with the translated info of the second; a failed query is -20999.
template <class T, class Call>
Status Queried(Lapack routine, int n, Call call) {
    T size = 0;
    int info = 0;
    call(&size, -1, &info);
    if (info != 0) return InternalErr;
    const int lwork = std::max(1, static_cast<int>(std::real(size)));
    Scratch<T> work;
    if (work.Allocate(static_cast<size_t>(lwork)) != 0) return OutOfMemoryErr;
    call(work.get(), lwork, &info);
    return MergeRelease(LapackStatus(routine, info, n), work.Release());
}

}  // namespace

Status Gees(int n, double* a, DgeesSelect select, int* sdim, double* wr, double* wi, double* vs) {
    const char jobvs = vs != nullptr ? 'V' : 'N', sort = select != nullptr ? 'S' : 'N';
    const int ldvs = std::max(n, 1);
    Scratch<int> bwork;
    if (bwork.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double size = 0;
    int info = 0, query = -1;
    dgees_(&jobvs, &sort, select, &n, a, &n, sdim, wr, wi, vs, &ldvs, &size, &query, bwork.get(), &info, 1, 1);
    if (info != 0) return MergeRelease(InternalErr, bwork.Release());
    const int lwork = std::max(1, static_cast<int>(size));
    Scratch<double> work;
    if (work.Allocate(static_cast<size_t>(lwork)) != 0) return MergeRelease(OutOfMemoryErr, bwork.Release());
    dgees_(&jobvs, &sort, select, &n, a, &n, sdim, wr, wi, vs, &ldvs, work.get(), &lwork, bwork.get(), &info, 1, 1);
    return MergeRelease(MergeRelease(LapackStatus(Lapack::Gees, info, n), work.Release()), bwork.Release());
}

Status Gees(int n, cdouble* a, ZgeesSelect select, int* sdim, cdouble* w, cdouble* vs) {
    const char jobvs = vs != nullptr ? 'V' : 'N', sort = select != nullptr ? 'S' : 'N';
    const int ldvs = std::max(n, 1);
    Scratch<int> bwork;
    Scratch<double> rwork;
    if (bwork.Allocate(static_cast<size_t>(n)) != 0 || rwork.Allocate(static_cast<size_t>(n)) != 0)
        return OutOfMemoryErr;
    cdouble size = 0;
    int info = 0, query = -1;
    zgees_(&jobvs, &sort, select, &n, a, &n, sdim, w, vs, &ldvs, &size, &query, rwork.get(), bwork.get(), &info, 1, 1);
    Status s = info != 0 ? InternalErr : 0;
    const int lwork = std::max(1, static_cast<int>(size.real()));
    Scratch<cdouble> work;
    if (s == 0 && work.Allocate(static_cast<size_t>(lwork)) != 0) s = OutOfMemoryErr;
    if (s == 0) {
        zgees_(&jobvs, &sort, select, &n, a, &n, sdim, w, vs, &ldvs, work.get(), &lwork, rwork.get(), bwork.get(),
               &info, 1, 1);
        s = LapackStatus(Lapack::Gees, info, n);
    }
    return MergeRelease(MergeRelease(MergeRelease(s, work.Release()), bwork.Release()), rwork.Release());
}

int Trexc(int n, double* t, double* q, int ifst, int* ilst) {
    const char compq = q != nullptr ? 'V' : 'N';
    Scratch<double> work;
    if (work.Allocate(static_cast<size_t>(n)) != 0) return -1;
    int info = 0, ldq = std::max(n, 1);
    dtrexc_(&compq, &n, t, &n, q, &ldq, &ifst, ilst, work.get(), &info, 1);
    return info;
}

int Trexc(int n, cdouble* t, cdouble* q, int ifst, int* ilst) {
    const char compq = q != nullptr ? 'V' : 'N';
    int info = 0, ldq = std::max(n, 1);
    ztrexc_(&compq, &n, t, &n, q, &ldq, &ifst, ilst, &info, 1);
    return info;
}

Status Gges(int n, double* a, double* b, double* alphar, double* alphai, double* beta, double* q, double* z) {
    Scratch<int> bwork;
    if (bwork.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    int sdim = 0;
    const Status s = Queried<double>(Lapack::Gges, n, [&](double* w, int lw, int* info) {
        dgges_("V", "V", "N", nullptr, &n, a, &n, b, &n, &sdim, alphar, alphai, beta, q, &n, z, &n, w, &lw,
               bwork.get(), info, 1, 1, 1);
    });
    return MergeRelease(s, bwork.Release());
}

Status Gges(int n, cdouble* a, cdouble* b, cdouble* alpha, cdouble* beta, cdouble* q, cdouble* z) {
    Scratch<int> bwork;
    Scratch<double> rwork;
    if (bwork.Allocate(static_cast<size_t>(n)) != 0 || rwork.Allocate(8 * static_cast<size_t>(n)) != 0)
        return OutOfMemoryErr;
    int sdim = 0;
    const Status s = Queried<cdouble>(Lapack::Gges, n, [&](cdouble* w, int lw, int* info) {
        zgges_("V", "V", "N", nullptr, &n, a, &n, b, &n, &sdim, alpha, beta, q, &n, z, &n, w, &lw, rwork.get(),
               bwork.get(), info, 1, 1, 1);
    });
    return MergeRelease(MergeRelease(s, bwork.Release()), rwork.Release());
}

Status Gghrd(int n, double* a, double* b, double* q, double* z) {
    int info = 0, one = 1;
    dgghrd_("V", "I", &n, &one, &n, a, &n, b, &n, q, &n, z, &n, &info, 1, 1);
    return info < 0 ? InternalErr : 0;
}

Status Gghrd(int n, cdouble* a, cdouble* b, cdouble* q, cdouble* z) {
    int info = 0, one = 1;
    zgghrd_("V", "I", &n, &one, &n, a, &n, b, &n, q, &n, z, &n, &info, 1, 1);
    return info < 0 ? InternalErr : 0;
}

Status Hgeqz(int n, double* h, double* t, double* alphar, double* alphai, double* beta, double* q, double* z) {
    int one = 1;
    return Queried<double>(Lapack::Hgeqz, n, [&](double* w, int lw, int* info) {
        dhgeqz_("S", "V", "V", &n, &one, &n, h, &n, t, &n, alphar, alphai, beta, q, &n, z, &n, w, &lw, info, 1, 1, 1);
    });
}

Status Hgeqz(int n, cdouble* h, cdouble* t, cdouble* alpha, cdouble* beta, cdouble* q, cdouble* z) {
    Scratch<double> rwork;
    if (rwork.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    int one = 1;
    const Status s = Queried<cdouble>(Lapack::Hgeqz, n, [&](cdouble* w, int lw, int* info) {
        zhgeqz_("S", "V", "V", &n, &one, &n, h, &n, t, &n, alpha, beta, q, &n, z, &n, w, &lw, rwork.get(), info, 1, 1,
                1);
    });
    return MergeRelease(s, rwork.Release());
}

int Tgexc(int n, double* a, double* b, double* q, double* z, int* ifst, int* ilst) {
    int yes = 1, info = 0, query = -1;
    double size = 0;
    dtgexc_(&yes, &yes, &n, a, &n, b, &n, q, &n, z, &n, ifst, ilst, &size, &query, &info);
    if (info != 0) return -1;
    const int lwork = std::max(1, static_cast<int>(size));
    Scratch<double> work;
    if (work.Allocate(static_cast<size_t>(lwork)) != 0) return -1;
    dtgexc_(&yes, &yes, &n, a, &n, b, &n, q, &n, z, &n, ifst, ilst, work.get(), &lwork, &info);
    return info;
}

int Tgexc(int n, cdouble* a, cdouble* b, cdouble* q, cdouble* z, int* ifst, int* ilst) {
    int yes = 1, info = 0;
    ztgexc_(&yes, &yes, &n, a, &n, b, &n, q, &n, z, &n, ifst, ilst, &info);
    return info;
}

Status Tgevc(char side, int n, const double* s, const double* p, double* vl, double* vr) {
    Scratch<double> work;
    if (work.Allocate(6 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    int info = 0, m = 0;
    dtgevc_(&side, "B", nullptr, &n, s, &n, p, &n, vl, &n, vr, &n, &n, &m, work.get(), &info, 1, 1);
    return MergeRelease(LapackStatus(Lapack::Tgevc, info, n), work.Release());
}

Status Tgevc(char side, int n, const cdouble* s, const cdouble* p, cdouble* vl, cdouble* vr) {
    Scratch<cdouble> work;
    Scratch<double> rwork;
    if (work.Allocate(2 * static_cast<size_t>(n)) != 0 || rwork.Allocate(2 * static_cast<size_t>(n)) != 0)
        return OutOfMemoryErr;
    int info = 0, m = 0;
    ztgevc_(&side, "B", nullptr, &n, s, &n, p, &n, vl, &n, vr, &n, &n, &m, work.get(), rwork.get(), &info, 1, 1);
    return MergeRelease(MergeRelease(LapackStatus(Lapack::Tgevc, info, n), work.Release()), rwork.Release());
}

void Gebak(char job, char side, int n, int ilo, int ihi, const double* scale, int m, double* v, int ldv) {
    int info = 0;
    dgebak_(&job, &side, &n, &ilo, &ihi, scale, &m, v, &ldv, &info, 1, 1);
}

void Gebak(char job, char side, int n, int ilo, int ihi, const double* scale, int m, cdouble* v, int ldv) {
    int info = 0;
    zgebak_(&job, &side, &n, &ilo, &ihi, scale, &m, v, &ldv, &info, 1, 1);
}

#define TW_LAPACK(T)                                                                          \
    template Status Geqp3<T>(int, int, T*, int, int*, T*);                                    \
    template Status Orgqr<T>(int, int, int, T*, int, const T*);                               \
    template Status Gehrd<T>(int, int, int, T*, int, T*);                                     \
    template Status Orghr<T>(int, int, int, T*, int, const T*);                               \
    template Status Gebal<T>(char, int, T*, int, int*, int*, double*);                        \
    template Status Gbsv<T>(int, int, int, int, T*, int, int*, T*, int);                      \
    template Status Ggsvd<T>(bool, int, int, int, int*, int*, T*, int, T*, int, double*, double*, T*, int, T*, int, \
                             T*, int);
TW_LAPACK(double)
TW_LAPACK(cdouble)
#undef TW_LAPACK

template Status Gelqf<double>(int, int, double*, int, double*);
template Status Gelqf<cdouble>(int, int, cdouble*, int, cdouble*);
template Status Orglq<double>(int, int, int, double*, int, const double*);
template Status Orglq<cdouble>(int, int, int, cdouble*, int, const cdouble*);

int Trsyl(char transA, char transB, int isgn, int m, int n, const double* a, const double* b, double* c, double* scale) {
    int info = 0;
    const int lda = std::max(m, 1), ldb = std::max(n, 1);
    dtrsyl_(&transA, &transB, &isgn, &m, &n, a, &lda, b, &ldb, c, &lda, scale, &info, 1, 1);
    return info;
}

int Trsyl(char transA, char transB, int isgn, int m, int n, const cdouble* a, const cdouble* b, cdouble* c,
          double* scale) {
    int info = 0;
    const int lda = std::max(m, 1), ldb = std::max(n, 1);
    ztrsyl_(&transA, &transB, &isgn, &m, &n, a, &lda, b, &ldb, c, &lda, scale, &info, 1, 1);
    return info;
}

Status Gelsd(int m, int n, double* a, double* b, double rcond) {
    const int order = std::max(m, n), minmn = std::min(m, n), lda = std::max(m, 1), ldb = std::max(order, 1);
    const int nrhs = 1;
    int rank = 0, info = 0, lwork = -1;
    double query = 0;
    Scratch<double> s, work;
    Scratch<int> iwork;
    const int levels = static_cast<int>(std::log2(static_cast<double>(std::max(minmn, 1)))) + 1;
    if (s.Allocate(static_cast<size_t>(std::max(minmn, 1))) != 0 ||
        iwork.Allocate((3 * static_cast<size_t>(levels) + 11) * static_cast<size_t>(std::max(minmn, 1))) != 0)
        return OutOfMemoryErr;
    dgelsd_(&m, &n, &nrhs, a, &lda, b, &ldb, s.get(), &rcond, &rank, &query, &lwork, iwork.get(), &info);
    if (info != 0) return LapackStatus(Lapack::Gelsd, info, n);
    lwork = static_cast<int>(query);
    if (work.Allocate(static_cast<size_t>(std::max(lwork, 1))) != 0) return OutOfMemoryErr;
    dgelsd_(&m, &n, &nrhs, a, &lda, b, &ldb, s.get(), &rcond, &rank, work.get(), &lwork, iwork.get(), &info);
    return LapackStatus(Lapack::Gelsd, info, n);
}

Status LapackStatus(Lapack routine, int info, int n) {
    for (const InfoRule& r : kRules)
        if (r.routine == routine && Matches(r.when, info, n)) return r.status;
    return 0;
}

}  // namespace tw

// Replace the implementation's own error routines, which may end the process. The report goes
// to standard error, where the host's diagnostics go.
TW_API void xerbla_(const char* name, const int* info, size_t nameLength) {
    char buffer[32];
    size_t n = nameLength < sizeof buffer - 1 ? nameLength : sizeof buffer - 1;
    while (n > 0 && (name[n - 1] == ' ' || name[n - 1] == '\0')) --n;
    std::memcpy(buffer, name, n);
    buffer[n] = '\0';
    tw::Report(buffer, *info);
}

TW_API void cblas_xerbla(int parameter, const char* routine, const char* form, ...) {
    (void)form;
    tw::Report(routine, parameter);
}
