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

BENCHMARK(DirectDgemm)->Arg(64)->Arg(256)->Arg(1024)->Unit(benchmark::kMicrosecond);
BENCHMARK(MatrixMulFrame)->ArgsProduct({{64, 256, 1024}, {0, 1}})->Unit(benchmark::kMicrosecond);

}  // namespace

BENCHMARK_MAIN();
