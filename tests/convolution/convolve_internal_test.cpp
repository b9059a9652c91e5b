// The convolution cores on cases known exactly, and the transform length rule. Their error
// models against NumPy/SciPy are checked through the exports in tests/reference.
#include <gtest/gtest.h>

#include <complex>
#include <vector>

#include "signal/convolve.hpp"

namespace {

using cd = std::complex<double>;

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

TEST(ConvolutionCores, TransformLengthSkipsTwentyThree) {
    const int cases[][2] = {{1, 1},     {22, 22},     {23, 24},     {46, 48},    {47, 48},
                            {529, 532}, {1024, 1024}, {1025, 1025}, {1058, 1064}};
    for (const auto& c : cases) EXPECT_EQ(tw::ConvolutionFftLength(c[0]), c[1]) << c[0];
}

}  // namespace
