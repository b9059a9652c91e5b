// Many threads creating, using and destroying tables of overlapping lengths at once: the list and
// its counts are shared, the transforms take no lock.
#include <gtest/gtest.h>

#include <atomic>
#include <complex>
#include <thread>
#include <vector>

#include "twanlys/fft.h"
#include "twanlys/link.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;

const std::vector<int32_t> kLengths = {1, 2, 53, 60, 64, 97, 106, 128, 210, 529, 1000, 1009, 2809};

std::vector<cd> Spectrum(int32_t n, void** cell) {
    std::vector<double> v(static_cast<size_t>(n));
    for (int32_t i = 0; i < n; ++i) v[i] = std::cos(0.7 * i * i) + i % 5;
    twrt::Array1D<double> x(v);
    twrt::Array1D<cd> y;
    if (ReQXFFTH80_IDP(x.h(), y.h(), cell, 0, n, 0) != 0) return {};
    return y.vec();
}

TEST(FftThreads, ConcurrentTablesGiveTheSameSpectra) {
    std::vector<std::vector<cd>> want;
    for (int32_t n : kLengths) {
        void* cell = nullptr;
        want.push_back(Spectrum(n, &cell));
        TransformUnreserveProc(&cell);
    }
    std::atomic<int> mismatches{0};
    std::vector<std::thread> threads;
    for (int t = 0; t < 6; ++t) {
        threads.emplace_back([&, t] {
            void* cell = nullptr;
            for (int round = 0; round < 4; ++round) {
                for (size_t i = 0; i < kLengths.size(); ++i) {
                    const size_t k = (i * 7 + static_cast<size_t>(t + round)) % kLengths.size();
                    FftTable* extra = create_qxfft_table(kLengths[k]);
                    if (Spectrum(kLengths[k], &cell) != want[k]) ++mismatches;
                    destroy_qxfft_table(extra);
                }
            }
            TransformUnreserveProc(&cell);
        });
    }
    for (std::thread& th : threads) th.join();
    EXPECT_EQ(mismatches.load(), 0);
}

}  // namespace
