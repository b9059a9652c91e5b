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
}

namespace tw {

enum CblasOrder { CblasRowMajor = 101, CblasColMajor = 102 };
enum CblasTranspose { CblasNoTrans = 111, CblasTrans = 112, CblasConjTrans = 113 };

// LAPACK drivers whose info the library translates.
enum class Lapack { Gees, Gges, Hgeqz, Tgexc, Tgevc, Ggsvd, Gebal, Gbsv, Gttrf, Gelsd, Trsyl, Other };

// LQ factorisation and generation of its Q, real and complex, with the two-call workspace query.
template <class T> Status Gelqf(int m, int n, T* a, int lda, T* tau);
template <class T> Status Orglq(int m, int n, int k, T* a, int lda, const T* tau);

// The one translation of a driver's info into a status; n is the order of the problem.
Status LapackStatus(Lapack routine, int info, int n);

}  // namespace tw
