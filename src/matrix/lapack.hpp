// The LAPACK, BLAS and CBLAS entries the library calls, declared here rather than taken from an
// implementation's header so that any Debian alternative links through the generic names.
#pragma once

#include <cstddef>
#include <cstdint>

#include "frame/memory.hpp"

extern "C" {
// CBLAS, with the enumerations as the int values of the standard.
void cblas_dgemm(int order, int transA, int transB, int m, int n, int k, double alpha, const double* a,
                 int lda, const double* b, int ldb, double beta, double* c, int ldc);
void cblas_zgemm(int order, int transA, int transB, int m, int n, int k, const void* alpha, const void* a,
                 int lda, const void* b, int ldb, const void* beta, void* c, int ldc);

void dgelqf_(const int* m, const int* n, double* a, const int* lda, double* tau, double* work, const int* lwork,
             int* info);
void zgelqf_(const int* m, const int* n, void* a, const int* lda, void* tau, void* work, const int* lwork,
             int* info);
void dorglq_(const int* m, const int* n, const int* k, double* a, const int* lda, const double* tau,
             double* work, const int* lwork, int* info);
void zunglq_(const int* m, const int* n, const int* k, void* a, const int* lda, const void* tau, void* work,
             const int* lwork, int* info);
void dgeqp3_(const int* m, const int* n, double* a, const int* lda, int* jpvt, double* tau, double* work,
             const int* lwork, int* info);
void zgeqp3_(const int* m, const int* n, void* a, const int* lda, int* jpvt, void* tau, void* work, const int* lwork,
             double* rwork, int* info);
void dorgqr_(const int* m, const int* n, const int* k, double* a, const int* lda, const double* tau,
             double* work, const int* lwork, int* info);
void zungqr_(const int* m, const int* n, const int* k, void* a, const int* lda, const void* tau, void* work,
             const int* lwork, int* info);
void dgehrd_(const int* n, const int* ilo, const int* ihi, double* a, const int* lda, double* tau, double* work,
             const int* lwork, int* info);
void zgehrd_(const int* n, const int* ilo, const int* ihi, void* a, const int* lda, void* tau, void* work,
             const int* lwork, int* info);
void dorghr_(const int* n, const int* ilo, const int* ihi, double* a, const int* lda, const double* tau,
             double* work, const int* lwork, int* info);
void zunghr_(const int* n, const int* ilo, const int* ihi, void* a, const int* lda, const void* tau, void* work,
             const int* lwork, int* info);
// Character arguments carry their hidden lengths, as gfortran passes them.
void dgebal_(const char* job, const int* n, double* a, const int* lda, int* ilo, int* ihi, double* scale, int* info,
             size_t jobLength);
void zgebal_(const char* job, const int* n, void* a, const int* lda, int* ilo, int* ihi, double* scale, int* info,
             size_t jobLength);
void dggsvd_(const char* jobu, const char* jobv, const char* jobq, const int* m, const int* n, const int* p, int* k,
             int* l, double* a, const int* lda, double* b, const int* ldb, double* alpha, double* beta, double* u,
             const int* ldu, double* v, const int* ldv, double* q, const int* ldq, double* work, int* iwork,
             int* info, size_t, size_t, size_t);
void zggsvd_(const char* jobu, const char* jobv, const char* jobq, const int* m, const int* n, const int* p, int* k,
             int* l, void* a, const int* lda, void* b, const int* ldb, double* alpha, double* beta, void* u,
             const int* ldu, void* v, const int* ldv, void* q, const int* ldq, void* work, double* rwork,
             int* iwork, int* info, size_t, size_t, size_t);
void dgbsv_(const int* n, const int* kl, const int* ku, const int* nrhs, double* ab, const int* ldab, int* ipiv,
            double* b, const int* ldb, int* info);
void zgbsv_(const int* n, const int* kl, const int* ku, const int* nrhs, void* ab, const int* ldab, int* ipiv,
            void* b, const int* ldb, int* info);
void dgttrf_(const int* n, double* dl, double* d, double* du, double* du2, int* ipiv, int* info);
void dgttrs_(const char* trans, const int* n, const int* nrhs, const double* dl, const double* d, const double* du,
             const double* du2, const int* ipiv, double* b, const int* ldb, int* info, size_t transLength);
}

namespace tw {

enum CblasOrder { CblasRowMajor = 101, CblasColMajor = 102 };
enum CblasTranspose { CblasNoTrans = 111, CblasTrans = 112, CblasConjTrans = 113 };

// LAPACK drivers whose info the library translates.
enum class Lapack { Gees, Gges, Hgeqz, Tgexc, Tgevc, Ggsvd, Gebal, Gbsv, Gttrf, Gelsd, Trsyl, Other };

// LQ factorisation and generation of its Q, real and complex, with the two-call workspace query.
template <class T> Status Gelqf(int m, int n, T* a, int lda, T* tau);
template <class T> Status Orglq(int m, int n, int k, T* a, int lda, const T* tau);

// Pivoted QR of an m by n column-major matrix (jpvt in and out, 1-based) and generation of its Q
// with n columns from k reflectors.
template <class T> Status Geqp3(int m, int n, T* a, int lda, int* jpvt, T* tau);
template <class T> Status Orgqr(int m, int n, int k, T* a, int lda, const T* tau);

// Hessenberg reduction of rows and columns ilo..ihi (1-based) and its orthogonal factor.
template <class T> Status Gehrd(int n, int ilo, int ihi, T* a, int lda, T* tau);
template <class T> Status Orghr(int n, int ilo, int ihi, T* a, int lda, const T* tau);

// Balancing with job 'N', 'P', 'S' or 'B'; the status is the translated info.
template <class T> Status Gebal(char job, int n, T* a, int lda, int* ilo, int* ihi, double* scale);

// Generalised SVD of the m by n a and the p by n b (column-major); u, v and q are computed when
// vectors is set, else they are not touched. alpha and beta hold n values.
template <class T>
Status Ggsvd(bool vectors, int m, int n, int p, int* k, int* l, T* a, int lda, T* b, int ldb, double* alpha,
             double* beta, T* u, int ldu, T* v, int ldv, T* q, int ldq);

// Band solve; the status is the translated info.
template <class T> Status Gbsv(int n, int kl, int ku, int nrhs, T* ab, int ldab, int* ipiv, T* b, int ldb);

// Tridiagonal LU (status +20003 for a zero pivot, factors as written) and the solve with it.
Status Gttrf(int n, double* dl, double* d, double* du, double* du2, int* ipiv);
Status Gttrs(char trans, int n, int nrhs, const double* dl, const double* d, const double* du, const double* du2,
             const int* ipiv, double* b, int ldb);

// The one translation of a driver's info into a status; n is the order of the problem.
Status LapackStatus(Lapack routine, int info, int n);

}  // namespace tw
