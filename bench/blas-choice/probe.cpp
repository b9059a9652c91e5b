// Usage: bench/blas-choice/run.sh [work dir [threads tasks n lo hi]]  (builds this probe and runs it per BLAS)
//
// Measures what the choice of the default BLAS/LAPACK rests on, for whichever libblas.so.3 and
// liblapack.so.3 the dynamic loader finds: threads started at load and at first use, presence of
// dggsvd_/zggsvd_, whether parameter errors reach an interposed xerbla_ and the process goes on,
// the time of one 2000 by 2000 dgemm, and wrong dgemm results when many threads call it at once.
#include <dirent.h>
#include <dlfcn.h>

#include <atomic>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <random>
#include <thread>
#include <vector>

extern "C" {
void cblas_dgemm(int order, int ta, int tb, int m, int n, int k, double alpha, const double* a,
                 int lda, const double* b, int ldb, double beta, double* c, int ldc);
void dgetrf_(const int* m, const int* n, double* a, const int* lda, int* ipiv, int* info);
extern int probe_xerbla_calls;
extern int probe_cblas_xerbla_calls;
}

namespace {

int Threads() {
    int n = 0;
    if (DIR* d = opendir("/proc/self/task")) {
        while (dirent* e = readdir(d))
            if (e->d_name[0] != '.') ++n;
        closedir(d);
    }
    return n;
}

void Gemm(int m, int k, int p, const double* a, const double* b, double* c) {
    cblas_dgemm(101, 111, 111, m, p, k, 1.0, a, k, b, p, 0.0, c, p);
}

struct Task {
    int m, k, p;
    std::vector<double> a, b, want;
};

}  // namespace

int main(int argc, char** argv) {
    const int threadsAtLoad = Threads();
    const int nThreads = argc > 1 ? std::atoi(argv[1]) : 16;
    const int nTasks = argc > 2 ? std::atoi(argv[2]) : 2000;
    const int bigN = argc > 3 ? std::atoi(argv[3]) : 2000;
    const int lo = argc > 4 ? std::atoi(argv[4]) : 8, hi = argc > 5 ? std::atoi(argv[5]) : 160;

    // Runs first, on a library that has not been used yet. Different shapes and data per task; the
    // reference is a plain loop, and a fault of concurrent use is far above rounding.
    std::vector<Task> tasks(static_cast<size_t>(nTasks));
    std::mt19937_64 g(7);
    std::uniform_int_distribution<int> dim(lo, hi);
    std::uniform_real_distribution<double> u(-1, 1);
    for (auto& t : tasks) {
        t.m = dim(g), t.k = dim(g), t.p = dim(g);
        t.a.resize(size_t(t.m) * t.k);
        t.b.resize(size_t(t.k) * t.p);
        t.want.resize(size_t(t.m) * t.p);
        for (auto& v : t.a) v = u(g);
        for (auto& v : t.b) v = u(g);
        for (int i = 0; i < t.m; ++i)
            for (int j = 0; j < t.p; ++j) {
                double sum = 0;
                for (int l = 0; l < t.k; ++l) sum += t.a[size_t(i) * t.k + l] * t.b[size_t(l) * t.p + j];
                t.want[size_t(i) * t.p + j] = sum;
            }
    }
    std::atomic<int> next{0}, wrong{0};
    std::vector<std::thread> pool;
    const auto t0 = std::chrono::steady_clock::now();
    for (int i = 0; i < nThreads; ++i)
        pool.emplace_back([&] {
            std::vector<double> c;
            for (int j; (j = next.fetch_add(1)) < nTasks;) {
                const Task& t = tasks[size_t(j)];
                c.assign(t.want.size(), 0.0);
                Gemm(t.m, t.k, t.p, t.a.data(), t.b.data(), c.data());
                for (size_t e = 0; e < c.size(); ++e)
                    if (std::fabs(c[e] - t.want[e]) > 1e-12 * t.k) {
                        ++wrong;
                        break;
                    }
            }
        });
    for (auto& t : pool) t.join();
    const double s = std::chrono::duration<double>(std::chrono::steady_clock::now() - t0).count();
    std::printf("%d threads, %d dgemm tasks: %d wrong (%.2f s)\n", nThreads, nTasks, wrong.load(), s);
    Dl_info info{};
    dladdr(reinterpret_cast<void*>(&cblas_dgemm), &info);
    std::printf("cblas_dgemm from  %s\n", info.dli_fname);
    dladdr(reinterpret_cast<void*>(&dgetrf_), &info);
    std::printf("dgetrf_ from      %s\n", info.dli_fname);
    std::printf("dggsvd_ %s, zggsvd_ %s\n", dlsym(RTLD_DEFAULT, "dggsvd_") ? "present" : "MISSING",
                dlsym(RTLD_DEFAULT, "zggsvd_") ? "present" : "MISSING");

    {
        double a[4] = {1, 2, 3, 4}, b[4] = {1, 0, 0, 1}, c[4];
        Gemm(2, 2, 2, a, b, c);
    }
    std::printf("threads at load %d, after first dgemm %d\n", threadsAtLoad, Threads());

    {
        const int m = -1, n = 2, lda = 1;
        int ipiv[2], inf = 0;
        double a[2] = {0, 0};
        dgetrf_(&m, &n, a, &lda, ipiv, &inf);
        double x[4] = {1, 2, 3, 4}, c[4];
        cblas_dgemm(999, 111, 111, 2, 2, 2, 1.0, x, 2, x, 2, 0.0, c, 2);
        std::printf("dgetrf_ info %d; own xerbla_ reached %d time(s), own cblas_xerbla %d time(s); "
                    "process goes on\n",
                    inf, probe_xerbla_calls, probe_cblas_xerbla_calls);
    }

    {
        std::vector<double> a(size_t(bigN) * bigN), b(a.size()), c(a.size());
        std::mt19937_64 g(1);
        std::uniform_real_distribution<double> u(-1, 1);
        for (auto& v : a) v = u(g);
        for (auto& v : b) v = u(g);
        const auto t0 = std::chrono::steady_clock::now();
        Gemm(bigN, bigN, bigN, a.data(), b.data(), c.data());
        const double s = std::chrono::duration<double>(std::chrono::steady_clock::now() - t0).count();
        std::printf("dgemm %d x %d: %.3f s (%.2f GFlop/s), threads now %d\n", bigN, bigN, s,
                    2.0 * bigN * bigN * double(bigN) / s * 1e-9, Threads());
    }

    return 0;
}
