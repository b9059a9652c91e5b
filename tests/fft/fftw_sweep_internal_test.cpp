// Thousands of random smooth lengths up to 2^20 against FFTW, forward real and complex: the sweep
// that NumPy is too slow to run from Python.
#include <fftw3.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <set>
#include <vector>

#include "common/helpers.hpp"
#include "transform/fft/fft.hpp"

namespace {

constexpr double kEps = 2.220446049250313e-16;
constexpr int kPrimes[] = {2, 3, 5, 7, 11, 13, 17, 19, 29, 31, 37, 41, 43};

bool Smooth(int64_t n) {
    for (int p : kPrimes)
        while (n % p == 0) n /= p;
    return n == 1;
}

// Instrumented builds and the run on the arena take a sample of the sweep.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool kInstrumented = true;
#else
constexpr bool kInstrumented = false;
#endif

std::vector<int32_t> RandomSmoothLengths(int count) {
    std::mt19937_64 rng(20261121);
    std::uniform_real_distribution<double> logn(std::log(2049.0), std::log(double(1 << 20)));
    std::set<int32_t> lengths;
    while (static_cast<int>(lengths.size()) < count) {
        auto n = static_cast<int32_t>(std::exp(logn(rng)));
        while (!Smooth(n)) ++n;
        if (n <= (1 << 20)) lengths.insert(n);
    }
    return {lengths.begin(), lengths.end()};
}

TEST(FftSweep, RandomSmoothLengthsAgreeWithFftw) {
    const int count = (kInstrumented || twtest::WorkspaceMode()) ? 60 : 2000;
    std::mt19937_64 rng(7);
    std::uniform_real_distribution<double> uniform(-1.0, 1.0);
    double worstComplex = 0, worstReal = 0;
    int32_t worstComplexN = 0, worstRealN = 0;
    for (int32_t n : RandomSmoothLengths(count)) {
        const size_t m = static_cast<size_t>(n);
        std::vector<double> re(m), im(m), zero(m, 0.0), outRe(m), outIm(m), hc(m);
        for (size_t i = 0; i < m; ++i) {
            re[i] = uniform(rng);
            im[i] = uniform(rng);
        }
        // One plan serves both references: the complex input, and the real part alone.
        auto* in = fftw_alloc_complex(m);
        auto* ref = fftw_alloc_complex(m);
        auto* realRef = fftw_alloc_complex(m);
        fftw_plan plan = fftw_plan_dft_1d(n, in, ref, FFTW_FORWARD, FFTW_ESTIMATE);
        for (size_t i = 0; i < m; ++i) {
            in[i][0] = re[i];
            in[i][1] = im[i];
        }
        fftw_execute(plan);
        for (size_t i = 0; i < m; ++i) in[i][1] = 0.0;
        fftw_execute_dft(plan, in, realRef);

        tw::FftTable* table = tw::CreateFftTable(n);
        ASSERT_NE(table, nullptr) << n;
        ASSERT_EQ(tw::FftComplexForward(table, re.data(), im.data(), outRe.data(), outIm.data(), 1, 1, n), 0);
        ASSERT_EQ(tw::FftRealForward(table, re.data(), hc.data(), 1, 1, n), 0);
        tw::DestroyFftTable(table);

        double scale = 0, errComplex = 0, realScale = 0, errReal = 0;
        for (size_t k = 0; k < m; ++k) {
            scale = std::max(scale, std::hypot(ref[k][0], ref[k][1]));
            errComplex = std::max(errComplex, std::hypot(outRe[k] - ref[k][0], outIm[k] - ref[k][1]));
        }
        // Half-complex order: hc[k] = Re X[k] for k <= n/2, hc[n-k] = Im X[k] for 0 < k < n/2.
        for (size_t k = 0; k <= m / 2; ++k) {
            const double i = (k == 0 || 2 * k == m) ? 0.0 : hc[m - k];
            realScale = std::max(realScale, std::hypot(realRef[k][0], realRef[k][1]));
            errReal = std::max(errReal, std::hypot(hc[k] - realRef[k][0], i - realRef[k][1]));
        }
        const double tolerance = 64 * kEps * std::log2(double(n));
        EXPECT_LE(errComplex / scale, tolerance) << "complex n=" << n;
        EXPECT_LE(errReal / realScale, tolerance) << "real n=" << n;
        if (errComplex / scale > worstComplex) worstComplex = errComplex / scale, worstComplexN = n;
        if (errReal / realScale > worstReal) worstReal = errReal / realScale, worstRealN = n;

        fftw_destroy_plan(plan);
        fftw_free(in);
        fftw_free(ref);
        fftw_free(realRef);
    }
    fftw_cleanup();
    std::printf("%d lengths: worst complex %.2e (n=%d), worst real %.2e (n=%d)\n", count, worstComplex,
                worstComplexN, worstReal, worstRealN);
}

}  // namespace
