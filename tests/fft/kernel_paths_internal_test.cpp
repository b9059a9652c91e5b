// The transforms against FFTW on lengths picked for the kernel paths they take, in every data
// layout: interleaved and split complex, unit and odd strides.
#include <fftw3.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <vector>

#include "transform/fft/fft.hpp"

namespace {

constexpr double kEps = 2.220446049250313e-16;

struct PathCase {
    int32_t n;
    const char* path;
};

// Leaves of two or three sub-transforms, partial last blocks, combines whose rows lie far apart
// (chunked, with and without a partial last chunk), Rader leaves and combines, nested Rader, and
// long transforms whose top-level sub-transforms run in groups.
const PathCase kCases[] = {
    {20, "leaf 10 of 2"},         {48, "leaf 16 of 3"},
    {60, "leaf 10 of 3, radix-3 combine of 20 columns"},
    {96, "outlined leaf 32 of 3"}, {1024, "combine of 31 columns: partial block"},
    {4000, "radix-4 combine of 1000 columns, not chunked"},
    {10000, "radix-10 combine of 1000 columns: chunks and a partial chunk"},
    {8192, "radix-8 combine of 1024 columns: whole chunks"},
    {48000, "radix-10 combine of 1600 columns: chunks and a partial chunk"},
    {65536, "radix-32 combine of 1024 columns, below a radix-2 combine of 32768"},
    {106, "Rader leaf of 2 as one group"}, {159, "Rader leaf of 3 as one group"},
    {530, "Rader leaf of 10 in groups of 4, 4 and 2; the radix-4 combines of a group of 4 in lanes"},
    {53 * 59, "Rader combine over a Rader leaf"},
    {10007, "Rader three deep: 10007, 5003 one by one, 61 in groups of 4 and a last one"},
    {100000, "top level of 10 in a group of 8 with leaves side by side, and 2 alone"},
    {1000, "a group of 8 whose radix-10 leaves and combines of 10 columns run side by side, and 2 alone"},
    {4096, "a group of 4 whose radix-32 combines of 32 columns run side by side"},
    {1 << 20, "radix-32 leaves side by side under four radix-32 levels"},
    {78125, "group of 5 over radix-5 leaves: 4 in vector lanes, 1 alone"},
    {71875, "group of 5 over radix-23 leaves, one by one"},
    {127253, "group of 7 over Rader-53 leaves, one by one"},
};

struct Layout {
    bool interleaved;
    ptrdiff_t in, out;
};

const Layout kLayouts[] = {{true, 2, 2}, {true, 6, 4}, {false, 1, 1}, {false, 3, 2}};

double MaxAbs(const fftw_complex* x, int32_t n) {
    double m = 0;
    for (int32_t k = 0; k < n; ++k) m = std::max(m, std::hypot(x[k][0], x[k][1]));
    return m;
}

TEST(FftKernelPaths, AgreeWithFftwInEveryLayout) {
    std::mt19937_64 rng(90210);
    std::uniform_real_distribution<double> uniform(-1.0, 1.0);
    for (const PathCase& c : kCases) {
        const int32_t n = c.n;
        const size_t m = static_cast<size_t>(n);
        std::vector<double> re(m), im(m);
        for (size_t i = 0; i < m; ++i) re[i] = uniform(rng), im[i] = uniform(rng);
        auto* in = fftw_alloc_complex(m);
        auto* ref = fftw_alloc_complex(m);
        auto* realRef = fftw_alloc_complex(m);
        fftw_plan plan = fftw_plan_dft_1d(n, in, ref, FFTW_FORWARD, FFTW_ESTIMATE);
        for (size_t i = 0; i < m; ++i) in[i][0] = re[i], in[i][1] = im[i];
        fftw_execute(plan);
        for (size_t i = 0; i < m; ++i) in[i][1] = 0.0;
        fftw_execute_dft(plan, in, realRef);
        const double tolerance = 256 * kEps * std::log2(double(n));
        const double scale = MaxAbs(ref, n), realScale = MaxAbs(realRef, n);

        FftTable* table = tw::CreateFftTable(n);
        ASSERT_NE(table, nullptr) << n;
        for (const Layout& l : kLayouts) {
            // Complex: the input lanes at stride l.in (interleaved: one block, im one f64 behind re;
            // split: the two halves of one block), the output likewise at l.out.
            const size_t halfIn = m * l.in, halfOut = m * l.out;
            std::vector<double> x(2 * halfIn, 7.0), y(2 * halfOut, 7.0);
            const ptrdiff_t gi = l.interleaved ? 1 : static_cast<ptrdiff_t>(halfIn);
            const ptrdiff_t go = l.interleaved ? 1 : static_cast<ptrdiff_t>(halfOut);
            for (size_t i = 0; i < m; ++i) x[i * l.in] = re[i], x[i * l.in + gi] = im[i];
            ASSERT_EQ(tw::FftComplexForward(table, x.data(), x.data() + gi, y.data(), y.data() + go, l.in, l.out, n),
                      0);
            double err = 0;
            for (size_t k = 0; k < m; ++k)
                err = std::max(err, std::hypot(y[k * l.out] - ref[k][0], y[k * l.out + go] - ref[k][1]));
            EXPECT_LE(err / scale, tolerance) << c.path << ", complex n=" << n << " stride " << l.in;
            // Cells between the strided outputs are not written.
            if (l.out > 2) {
                EXPECT_EQ(y[l.out - 1], 7.0) << c.path << " n=" << n;
            }

            // Real: the real parts at the same strides, half-complex out.
            std::vector<double> r(halfIn, 7.0), h(halfOut, 7.0);
            for (size_t i = 0; i < m; ++i) r[i * l.in] = re[i];
            ASSERT_EQ(tw::FftRealForward(table, r.data(), h.data(), l.in, l.out, n), 0);
            err = 0;
            for (size_t k = 0; k <= m / 2; ++k) {
                const double hi = (k == 0 || 2 * k == m) ? 0.0 : h[(m - k) * l.out];
                err = std::max(err, std::hypot(h[k * l.out] - realRef[k][0], hi - realRef[k][1]));
            }
            EXPECT_LE(err / realScale, tolerance) << c.path << ", real n=" << n << " stride " << l.in;
        }
        tw::DestroyFftTable(table);
        fftw_destroy_plan(plan);
        fftw_free(in);
        fftw_free(ref);
        fftw_free(realRef);
    }
    fftw_cleanup();
}

}  // namespace
