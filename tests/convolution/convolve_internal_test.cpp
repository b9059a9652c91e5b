// The convolution cores on cases known exactly, and the transform length rule. Their error
// models against NumPy/SciPy are checked through the exports in tests/reference.
#include <gtest/gtest.h>

#include <complex>
#include <vector>

#include "signal/convolve.hpp"

namespace {

using cd = std::complex<double>;
constexpr double kEps = 0x1p-52;

TEST(ConvolutionCores, IntegerProductsAreExact) {
    // Powers of (1 + z) and of (1 + i z): binomial coefficients, exact on the direct paths.
    std::vector<double> p{1};
    std::vector<cd> c{1};
    for (int k = 1; k <= 20; ++k) {
        std::vector<double> next(k + 1);
        std::vector<cd> cnext(k + 1);
        const double one[2] = {1, 1};
        const cd onei[2] = {1, cd(0, 1)};
        tw::ConvolveDirect(p.data(), k, one, 2, next.data());
        tw::CxConvolveDirect(onei, 2, c.data(), k, cnext.data());
        p = next;
        c = cnext;
    }
    double binom = 1;
    cd ipow = 1;
    for (int j = 0; j <= 20; ++j) {
        EXPECT_EQ(p[j], binom) << j;
        EXPECT_EQ(c[j], binom * ipow) << j;
        binom = binom * (20 - j) / (j + 1);
        ipow *= cd(0, 1);
    }
}

TEST(ConvolutionCores, CorrelationsReverseTheFirstOperand) {
    // x = (1, 2, 3), y = (4, 5): correlate(y, x, 'full') = (12, 23, 14, 5) by hand.
    const double x[] = {1, 2, 3}, y[] = {4, 5}, want[] = {12, 23, 14, 5};
    double direct[4], freq[4], autoc[5];
    tw::CorrelateDirect(x, 3, y, 2, direct);
    ASSERT_EQ(tw::CorrelateFrequency(x, 3, y, 2, freq), 0);
    for (int k = 0; k < 4; ++k) {
        EXPECT_EQ(direct[k], want[k]);
        EXPECT_NEAR(freq[k], want[k], 16 * kEps * 14);
    }
    // Auto-correlation of (1, 2, 3): (3, 8, 14, 8, 3), lag 0 in the middle.
    ASSERT_EQ(tw::AutoCorrelateFrequency(x, 3, autoc), 0);
    const double wantAuto[] = {3, 8, 14, 8, 3};
    for (int k = 0; k < 5; ++k) EXPECT_NEAR(autoc[k], wantAuto[k], 16 * kEps * 14) << k;
}

TEST(ConvolutionCores, TransformLengthSkipsTwentyThree) {
    const int cases[][2] = {{1, 1},     {22, 22},     {23, 24},     {46, 48},    {47, 48},
                            {529, 532}, {1024, 1024}, {1025, 1025}, {1058, 1064}};
    for (const auto& c : cases) EXPECT_EQ(tw::ConvolutionFftLength(c[0]), c[1]) << c[0];
}

}  // namespace
