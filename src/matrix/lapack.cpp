#include "matrix/lapack.hpp"

#include <cstdarg>
#include <cstdio>
#include <algorithm>
#include <complex>
#include <cstring>

#include "frame/frame.hpp"
#include "twanlys/matrix.h"

namespace tw {

namespace {

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

}  // namespace

template <class T> Status Gelqf(int m, int n, T* a, int lda, T* tau) {
    return WithWorkspace<T>([&](T* w, int lw, int* info) { Lqf(m, n, a, lda, tau, w, lw, info); });
}

template <class T> Status Orglq(int m, int n, int k, T* a, int lda, const T* tau) {
    return WithWorkspace<T>([&](T* w, int lw, int* info) { Glq(m, n, k, a, lda, tau, w, lw, info); });
}

template Status Gelqf<double>(int, int, double*, int, double*);
template Status Gelqf<cdouble>(int, int, cdouble*, int, cdouble*);
template Status Orglq<double>(int, int, int, double*, int, const double*);
template Status Orglq<cdouble>(int, int, int, cdouble*, int, const cdouble*);

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
