// The convolution cores against sums in extended precision, with the error models of the two
// paths; exact integer cases; the transform length rule.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <random>
#include <vector>

#include "signal/convolve.hpp"

namespace {

using cd = std::complex<double>;
using cld = std::complex<long double>;
constexpr double kEps = 0x1p-52;

template <class T, class L>
std::vector<L> Reference(const std::vector<T>& x, const std::vector<T>& y) {
    std::vector<L> z(x.size() + y.size() - 1, L{});
    for (size_t i = 0; i < x.size(); ++i)
        for (size_t j = 0; j < y.size(); ++j) z[i + j] += L(x[i]) * L(y[j]);
    return z;
}

template <class T>
std::vector<T> Random(size_t n, std::mt19937& g) {
    std::normal_distribution<double> d;
    std::vector<T> v(n);
    for (auto& e : v) {
        if constexpr (std::is_same_v<T, cd>)
            e = {d(g), d(g)};
        else
            e = d(g);
    }
    return v;
}

template <class T>
double Norm2(const std::vector<T>& v) {
    double s = 0;
    for (const T& e : v) s += std::norm(cd(e));
    return std::sqrt(s);
}

struct Sizes {
    int nx, ny;
};
// Lengths whose transform length is a plain power of two, odd, one past 23 and a large prime.
const Sizes kSizes[] = {{1, 1}, {1, 9}, {9, 1}, {5, 4}, {12, 12}, {16, 17}, {40, 7}, {100, 433}, {1009, 300}};

TEST(ConvolutionCores, BothPathsMeetTheirErrorModels) {
    std::mt19937 g(3);
    for (const Sizes s : kSizes) {
        const auto x = Random<double>(s.nx, g), y = Random<double>(s.ny, g);
        const auto cx = Random<cd>(s.nx, g), cy = Random<cd>(s.ny, g);
        const int m = s.nx + s.ny - 1;
        const double logn = std::max(1.0, std::log2(tw::ConvolutionFftLength(m)));
        const auto ref = Reference<double, long double>(x, y);
        const auto cref = Reference<cd, cld>(cx, cy);
        // |x| * |y| bounds each term's rounding in the direct sums.
        std::vector<double> ax(x.size()), ay(y.size()), acx(cx.size()), acy(cy.size());
        for (size_t i = 0; i < x.size(); ++i) ax[i] = std::fabs(x[i]), acx[i] = std::abs(cx[i]);
        for (size_t i = 0; i < y.size(); ++i) ay[i] = std::fabs(y[i]), acy[i] = std::abs(cy[i]);
        const auto bound = Reference<double, long double>(ax, ay);
        const auto cbound = Reference<double, long double>(acx, acy);
        std::vector<double> direct(m), freq(m);
        std::vector<cd> cdirect(m), cfreq(m);
        tw::ConvolveDirect(x.data(), s.nx, y.data(), s.ny, direct.data());
        ASSERT_EQ(tw::ConvolveFrequency(x.data(), s.nx, y.data(), s.ny, freq.data()), 0);
        tw::CxConvolveDirect(cx.data(), s.nx, cy.data(), s.ny, cdirect.data());
        ASSERT_EQ(tw::CxConvolveFrequency(cx.data(), s.nx, cy.data(), s.ny, cfreq.data()), 0);
        const double lo = std::min(s.nx, s.ny);
        const double fbound = 4 * kEps * logn * Norm2(x) * Norm2(y);
        const double cfbound = 4 * kEps * logn * Norm2(cx) * Norm2(cy);
        for (int k = 0; k < m; ++k) {
            SCOPED_TRACE(testing::Message() << s.nx << " x " << s.ny << " at " << k);
            EXPECT_LE(std::fabs(direct[k] - static_cast<double>(ref[k])), 2 * kEps * lo * static_cast<double>(bound[k]));
            EXPECT_LE(std::fabs(freq[k] - static_cast<double>(ref[k])), fbound);
            EXPECT_LE(std::abs(cdirect[k] - cd(cref[k])), 4 * kEps * lo * static_cast<double>(cbound[k]));
            EXPECT_LE(std::abs(cfreq[k] - cd(cref[k])), cfbound);
        }
    }
}

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
    const int cases[][2] = {{1, 1}, {22, 22}, {23, 24}, {46, 48}, {47, 48}, {529, 532}, {1024, 1024}, {1025, 1025}, {1058, 1064}};
    for (const auto& c : cases) EXPECT_EQ(tw::ConvolutionFftLength(c[0]), c[1]) << c[0];
}

TEST(ConvolutionCores, NormalizationDividesByOverlapCounts) {
    // Overlap counts of lengths 2 and 4: 1, 2, 2, 2, 1.
    std::vector<double> z(5, 12.0);
    EXPECT_EQ(tw::NormalizeCorrelation(z.data(), 2, 4, 1), 0);
    EXPECT_EQ(z, (std::vector<double>{12, 6, 6, 6, 12}));
    std::vector<cd> w(5, cd(8, -4));
    EXPECT_EQ(tw::NormalizeCorrelation(w.data(), 4, 2, 2), 0);
    EXPECT_EQ(w[2], cd(2, -1));
    EXPECT_EQ(tw::NormalizeCorrelation(z.data(), 2, 4, 3), InvalidSelectorErr);
    EXPECT_EQ(z[0], 12.0);
}

}  // namespace
