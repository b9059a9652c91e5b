// The matrix frame against the BLAS and LAPACK beneath it: MatrixMul_head against a direct
// cblas_dgemm on the same data (the frame's overhead), and the library's own SVD and LU against
// LAPACK's dgesvd, dgesdd and dgetrf. Run: build/bench_matrix_bench (TW_BENCH=ON).
#include <benchmark/benchmark.h>

#include <random>
#include <vector>

#include "twanlys/matrix.h"
#include "twrt.hpp"

extern "C" {
void cblas_dgemm(int order, int ta, int tb, int m, int n, int k, double alpha, const double* a, int lda,
                 const double* b, int ldb, double beta, double* c, int ldc);
void dgesvd_(const char* jobu, const char* jobvt, const int* m, const int* n, double* a, const int* lda, double* s,
             double* u, const int* ldu, double* vt, const int* ldvt, double* work, const int* lwork, int* info,
             size_t, size_t);
void dgesdd_(const char* jobz, const int* m, const int* n, double* a, const int* lda, double* s, double* u,
             const int* ldu, double* vt, const int* ldvt, double* work, const int* lwork, int* iwork, int* info,
             size_t);
void dgetrf_(const int* m, const int* n, double* a, const int* lda, int* ipiv, int* info);
}

namespace {

std::vector<double> Random(size_t n, unsigned seed) {
    std::mt19937_64 g(seed);
    std::uniform_real_distribution<double> u(-1, 1);
    std::vector<double> v(n);
    for (double& x : v) x = u(g);
    return v;
}

void MatrixMulFrame(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0));
    const int copies = static_cast<int>(state.range(1));
    twrt::Array2D<double> a(n, n, Random(size_t(n) * n, 1)), b(n, n, Random(size_t(n) * n, 2)), c;
    int32_t status = 0;
    for (auto _ : state) {
        MatrixMulAligned_head(a.h(), b.h(), c.h(), copies, &status);
        benchmark::DoNotOptimize(c.data());
    }
    if (status != 0) state.SkipWithError("MatrixMul_head failed");
}

void DirectDgemm(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0));
    const std::vector<double> a = Random(size_t(n) * n, 1), b = Random(size_t(n) * n, 2);
    std::vector<double> c(size_t(n) * n);
    for (auto _ : state) {
        cblas_dgemm(101, 111, 111, n, n, n, 1.0, a.data(), n, b.data(), n, 0.0, c.data(), n);
        benchmark::DoNotOptimize(c.data());
    }
}

// Own SVD (U, s, V) through its export against LAPACK on the same square matrix.
void OwnSvd(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0));
    twrt::Array2D<double> a(n, n, Random(size_t(n) * n, 3)), u, v;
    twrt::Array1D<double> s;
    for (auto _ : state) {
        if (SVDEx_head(a.h(), 0, u.h(), s.h(), v.h()) != 0) state.SkipWithError("SVDEx_head failed");
        benchmark::DoNotOptimize(s.data());
    }
}

void LapackSvd(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0));
    const bool divide = state.range(1) != 0;
    const std::vector<double> a0 = Random(size_t(n) * n, 3);
    std::vector<double> a(a0.size()), s(static_cast<size_t>(n)), u(a0.size()), vt(a0.size()), work(1);
    std::vector<int> iwork(8 * static_cast<size_t>(n));
    int info = 0, lwork = -1;
    divide ? dgesdd_("S", &n, &n, a.data(), &n, s.data(), u.data(), &n, vt.data(), &n, work.data(), &lwork,
                     iwork.data(), &info, 1)
           : dgesvd_("S", "S", &n, &n, a.data(), &n, s.data(), u.data(), &n, vt.data(), &n, work.data(), &lwork,
                     &info, 1, 1);
    lwork = static_cast<int>(work[0]);
    work.resize(size_t(lwork));
    for (auto _ : state) {
        a = a0;
        divide ? dgesdd_("S", &n, &n, a.data(), &n, s.data(), u.data(), &n, vt.data(), &n, work.data(), &lwork,
                         iwork.data(), &info, 1)
               : dgesvd_("S", "S", &n, &n, a.data(), &n, s.data(), u.data(), &n, vt.data(), &n, work.data(),
                         &lwork, &info, 1, 1);
        benchmark::DoNotOptimize(s.data());
    }
}

// The in-place factorisations start from a fresh copy each time, in both.
void OwnLu(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0));
    const std::vector<double> a0 = Random(size_t(n) * n, 4);
    twrt::Array1D<int32_t> perm;
    int32_t parity = 0, status = 0;
    for (auto _ : state) {
        twrt::Array2D<double> a(n, n, a0);
        LU_head(a.h(), perm.h(), &parity, &status);
        benchmark::DoNotOptimize(a.data());
    }
}

void LapackLu(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0));
    const std::vector<double> a0 = Random(size_t(n) * n, 4);
    std::vector<int> ipiv(static_cast<size_t>(n));
    int info = 0;
    for (auto _ : state) {
        std::vector<double> a = a0;
        dgetrf_(&n, &n, a.data(), &n, ipiv.data(), &info);
        benchmark::DoNotOptimize(a.data());
    }
}

BENCHMARK(OwnSvd)->Arg(50)->Arg(200)->Arg(500)->Unit(benchmark::kMillisecond);
BENCHMARK(LapackSvd)->ArgsProduct({{50, 200, 500}, {0, 1}})->Unit(benchmark::kMillisecond);
BENCHMARK(OwnLu)->Arg(50)->Arg(200)->Arg(500)->Unit(benchmark::kMillisecond);
BENCHMARK(LapackLu)->Arg(50)->Arg(200)->Arg(500)->Unit(benchmark::kMillisecond);
BENCHMARK(DirectDgemm)->Arg(64)->Arg(256)->Arg(1024)->Unit(benchmark::kMicrosecond);
BENCHMARK(MatrixMulFrame)->ArgsProduct({{64, 256, 1024}, {0, 1}})->Unit(benchmark::kMicrosecond);

}  // namespace

BENCHMARK_MAIN();
