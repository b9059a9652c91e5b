// The LAPACK, BLAS and CBLAS entries the library calls, declared here rather than taken from an
// implementation's header so that any Debian alternative links through the generic names.
#pragma once

#include <complex>
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
// Schur forms, the generalised Schur form (QZ) and their reordering. Logical arguments are ints.
typedef int (*DgeesSelect)(const double*, const double*);
typedef int (*ZgeesSelect)(const void*);
void dgees_(const char* jobvs, const char* sort, DgeesSelect select, const int* n, double* a, const int* lda, int* sdim,
            double* wr, double* wi, double* vs, const int* ldvs, double* work, const int* lwork, int* bwork, int* info,
            size_t, size_t);
void zgees_(const char* jobvs, const char* sort, ZgeesSelect select, const int* n, void* a, const int* lda, int* sdim,
            void* w, void* vs, const int* ldvs, void* work, const int* lwork, double* rwork, int* bwork, int* info,
            size_t, size_t);
void dgges_(const char* jobvsl, const char* jobvsr, const char* sort, void* selctg, const int* n, double* a,
            const int* lda, double* b, const int* ldb, int* sdim, double* alphar, double* alphai, double* beta,
            double* vsl, const int* ldvsl, double* vsr, const int* ldvsr, double* work, const int* lwork, int* bwork,
            int* info, size_t, size_t, size_t);
void zgges_(const char* jobvsl, const char* jobvsr, const char* sort, void* selctg, const int* n, void* a,
            const int* lda, void* b, const int* ldb, int* sdim, void* alpha, void* beta, void* vsl, const int* ldvsl,
            void* vsr, const int* ldvsr, void* work, const int* lwork, double* rwork, int* bwork, int* info, size_t,
            size_t, size_t);
void dgghrd_(const char* compq, const char* compz, const int* n, const int* ilo, const int* ihi, double* a,
             const int* lda, double* b, const int* ldb, double* q, const int* ldq, double* z, const int* ldz, int* info,
             size_t, size_t);
void zgghrd_(const char* compq, const char* compz, const int* n, const int* ilo, const int* ihi, void* a,
             const int* lda, void* b, const int* ldb, void* q, const int* ldq, void* z, const int* ldz, int* info,
             size_t, size_t);
void dhgeqz_(const char* job, const char* compq, const char* compz, const int* n, const int* ilo, const int* ihi,
             double* h, const int* ldh, double* t, const int* ldt, double* alphar, double* alphai, double* beta,
             double* q, const int* ldq, double* z, const int* ldz, double* work, const int* lwork, int* info, size_t,
             size_t, size_t);
void zhgeqz_(const char* job, const char* compq, const char* compz, const int* n, const int* ilo, const int* ihi,
             void* h, const int* ldh, void* t, const int* ldt, void* alpha, void* beta, void* q, const int* ldq,
             void* z, const int* ldz, void* work, const int* lwork, double* rwork, int* info, size_t, size_t,
             size_t);
void dtgevc_(const char* side, const char* howmny, const int* select, const int* n, const double* s, const int* lds,
             const double* p, const int* ldp, double* vl, const int* ldvl, double* vr, const int* ldvr, const int* mm,
             int* m, double* work, int* info, size_t, size_t);
void ztgevc_(const char* side, const char* howmny, const int* select, const int* n, const void* s, const int* lds,
             const void* p, const int* ldp, void* vl, const int* ldvl, void* vr, const int* ldvr, const int* mm,
             int* m, void* work, double* rwork, int* info, size_t, size_t);
void dtgexc_(const int* wantq, const int* wantz, const int* n, double* a, const int* lda, double* b, const int* ldb,
             double* q, const int* ldq, double* z, const int* ldz, int* ifst, int* ilst, double* work,
             const int* lwork, int* info);
void ztgexc_(const int* wantq, const int* wantz, const int* n, void* a, const int* lda, void* b, const int* ldb,
             void* q, const int* ldq, void* z, const int* ldz, const int* ifst, int* ilst, int* info);
void dtrexc_(const char* compq, const int* n, double* t, const int* ldt, double* q, const int* ldq, int* ifst,
             int* ilst, double* work, int* info, size_t);
void ztrexc_(const char* compq, const int* n, void* t, const int* ldt, void* q, const int* ldq, const int* ifst,
             const int* ilst, int* info, size_t);
void dgebak_(const char* job, const char* side, const int* n, const int* ilo, const int* ihi, const double* scale,
             const int* m, double* v, const int* ldv, int* info, size_t, size_t);
void zgebak_(const char* job, const char* side, const int* n, const int* ilo, const int* ihi, const double* scale,
             const int* m, void* v, const int* ldv, int* info, size_t, size_t);
double dlapy2_(const double* x, const double* y);
// Sylvester equations on (quasi-)triangular matrices, and the minimum-norm least-squares driver.
void dtrsyl_(const char* trana, const char* tranb, const int* isgn, const int* m, const int* n, const double* a,
             const int* lda, const double* b, const int* ldb, double* c, const int* ldc, double* scale, int* info,
             size_t, size_t);
void ztrsyl_(const char* trana, const char* tranb, const int* isgn, const int* m, const int* n, const void* a,
             const int* lda, const void* b, const int* ldb, void* c, const int* ldc, double* scale, int* info,
             size_t, size_t);
void dgelsd_(const int* m, const int* n, const int* nrhs, double* a, const int* lda, double* b, const int* ldb,
             double* s, const double* rcond, int* rank, double* work, const int* lwork, int* iwork, int* info);
}

namespace tw {

using cdouble = std::complex<double>;

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

// Schur form of the column-major a (T replaces it); vs null computes no Schur vectors, select
// null sorts nothing. Work query first; a failed query is -20999.
Status Gees(int n, double* a, DgeesSelect select, int* sdim, double* wr, double* wi, double* vs);
Status Gees(int n, cdouble* a, ZgeesSelect select, int* sdim, cdouble* w, cdouble* vs);
// Moves the diagonal block at ifst to ilst (1-based); q null: no Schur vectors. The raw info.
int Trexc(int n, double* t, double* q, int ifst, int* ilst);
int Trexc(int n, cdouble* t, cdouble* q, int ifst, int* ilst);

// The QZ steps on column-major n by n blocks, Schur vectors always updated: the one-call driver,
// reduction to Hessenberg-triangular form (q updated, z from the identity), the QZ iteration
// ('S'), the exchange of diagonal blocks (raw info), and the eigenvectors, side 'R', 'L' or 'B'
// back-transformed through vl and vr.
Status Gges(int n, double* a, double* b, double* alphar, double* alphai, double* beta, double* q, double* z);
Status Gges(int n, cdouble* a, cdouble* b, cdouble* alpha, cdouble* beta, cdouble* q, cdouble* z);
Status Gghrd(int n, double* a, double* b, double* q, double* z);
Status Gghrd(int n, cdouble* a, cdouble* b, cdouble* q, cdouble* z);
Status Hgeqz(int n, double* h, double* t, double* alphar, double* alphai, double* beta, double* q, double* z);
Status Hgeqz(int n, cdouble* h, cdouble* t, cdouble* alpha, cdouble* beta, cdouble* q, cdouble* z);
int Tgexc(int n, double* a, double* b, double* q, double* z, int* ifst, int* ilst);
int Tgexc(int n, cdouble* a, cdouble* b, cdouble* q, cdouble* z, int* ifst, int* ilst);
Status Tgevc(char side, int n, const double* s, const double* p, double* vl, double* vr);
Status Tgevc(char side, int n, const cdouble* s, const cdouble* p, cdouble* vl, cdouble* vr);

// Back-transformation after balancing of the m columns of the column-major v; info ignored.
void Gebak(char job, char side, int n, int ilo, int ihi, const double* scale, int m, double* v, int ldv);
void Gebak(char job, char side, int n, int ilo, int ihi, const double* scale, int m, cdouble* v, int ldv);

inline double Lapy2(double x, double y) { return dlapy2_(&x, &y); }

// op(A) X + isgn X op(B) = scale C on column-major blocks; trans 'N', 'T' (real) or 'C' (complex).
// The raw info: above 0 means that close eigenvalues were perturbed.
int Trsyl(char transA, char transB, int isgn, int m, int n, const double* a, const double* b, double* c, double* scale);
int Trsyl(char transA, char transB, int isgn, int m, int n, const cdouble* a, const cdouble* b, cdouble* c,
          double* scale);
// Minimum-norm least squares of the column-major m by n a (destroyed) with one right-hand side in b
// (at least max(m, n) elements, x in its first n); the integer work as stated for order N.
Status Gelsd(int m, int n, double* a, double* b, double rcond);

// The one translation of a driver's info into a status; n is the order of the problem.
Status LapackStatus(Lapack routine, int info, int n);

}  // namespace tw
