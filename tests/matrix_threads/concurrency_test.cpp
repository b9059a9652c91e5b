// Many host threads inside the matrix exports at once: the results must equal those of one
// thread, and neither the library nor the BLAS beneath it may start a thread.
#include <dirent.h>
#include <dlfcn.h>
#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "twanlys/matrix.h"
#include "twrt.hpp"

namespace {

int ThreadCount() {
    int n = 0;
    if (DIR* d = opendir("/proc/self/task")) {
        while (dirent* e = readdir(d))
            if (e->d_name[0] != '.') ++n;
        closedir(d);
    }
    return n;
}

struct Task {
    int m, k, p;
    std::vector<double> a, b;
    std::vector<double> product;
    double cond[2];
};

void RunTask(const Task& t, std::vector<double>* product, double cond[2]) {
    twrt::Array2D<double> a(t.m, t.k, t.a), b(t.k, t.p, t.b), c;
    int32_t status = -1;
    MatrixMul_head(a.h(), b.h(), c.h(), &status);
    *product = status == 0 ? c.vec() : std::vector<double>();
    // The square leading block, for the two routes of the condition number (SVD and own LU).
    const int n = std::min(t.m, t.k);
    std::vector<double> sq(size_t(n) * n);
    for (int i = 0; i < n; ++i)
        for (int j = 0; j < n; ++j) sq[size_t(i) * n + j] = t.a[size_t(i) * t.k + j];
    twrt::Array2D<double> s(n, n, sq);
    for (int32_t type : {0, 1}) {
        int32_t ty = type;
        CondNumber_head(s.h(), &ty, &cond[type], &status);
        if (status != 0) cond[type] = -1;
    }
}

std::vector<Task> MakeTasks(int count, int maxCondOrder) {
    std::mt19937_64 g(11);
    std::uniform_int_distribution<int> dim(4, 96), order(2, maxCondOrder);
    std::uniform_real_distribution<double> u(-1, 1);
    std::vector<Task> tasks(static_cast<size_t>(count));
    for (Task& t : tasks) {
        t.m = dim(g), t.k = dim(g), t.p = dim(g);
        // Keep the SVD work of the condition number modest.
        t.m = std::min(t.m, order(g)) + 1;
        t.a.resize(size_t(t.m) * t.k);
        t.b.resize(size_t(t.k) * t.p);
        for (double& v : t.a) v = u(g);
        for (double& v : t.b) v = u(g);
    }
    return tasks;
}

// Debian's single-threaded OpenBLAS takes its buffers without a lock; concurrent callers can be
// handed the same buffer and get wrong products. Its config string names such a build.
TEST(MatrixThreads, BlasIsNotAnUnlockedSingleThreadedOpenBlas) {
    using Config = const char* (*)();
    if (auto config = reinterpret_cast<Config>(dlsym(RTLD_DEFAULT, "openblas_get_config"))) {
        const std::string text = config();
        EXPECT_EQ(text.find("SINGLE_THREADED"), std::string::npos)
            << "libblas.so.3 is " << text
            << ": not safe under concurrent calls; select the BLAS named in doc/blas-choice.md";
    }
}

TEST(MatrixThreads, ConcurrentCallsMatchOneThreadAndStartNoThread) {
    const int threads = 16, count = 2000;
    std::vector<Task> tasks = MakeTasks(count, 24);
    const int before = ThreadCount();
    // One thread of our own before any work; ThreadSanitizer keeps one more.
#ifdef __SANITIZE_THREAD__
    EXPECT_LE(before, 2) << "threads were started when the libraries were loaded";
#else
    EXPECT_EQ(before, 1) << "threads were started when the libraries were loaded";
#endif
    for (Task& t : tasks) {
        RunTask(t, &t.product, t.cond);
        ASSERT_FALSE(t.product.empty());
    }
    EXPECT_EQ(ThreadCount(), before) << "a thread was started by the library or its BLAS";

    std::atomic<int> next{0}, wrongProducts{0}, wrongConds{0};
    std::vector<std::thread> pool;
    for (int i = 0; i < threads; ++i)
        pool.emplace_back([&] {
            std::vector<double> product;
            double cond[2];
            for (int j; (j = next.fetch_add(1)) < count;) {
                const Task& t = tasks[size_t(j)];
                RunTask(t, &product, cond);
                if (product != t.product) ++wrongProducts;
                if (std::memcmp(cond, t.cond, sizeof cond) != 0) ++wrongConds;
            }
        });
    for (auto& t : pool) t.join();
    EXPECT_EQ(wrongProducts.load(), 0) << "of " << count << " products on " << threads << " threads";
    EXPECT_EQ(wrongConds.load(), 0) << "of " << count << " condition numbers on " << threads << " threads";
}

}  // namespace
