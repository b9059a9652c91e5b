// The Dolph-Chebyshev core on inverse transforms evaluated by direct summation in long double.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <numbers>
#include <vector>

#include "window/dolph_chebyshev.hpp"

namespace {

#include "chebwin_reference.inc"

using tw::Status;

Status DirectInverseReal(double* v, int32_t N, double* out) {
    const int32_t h = (N + 1) / 2;
    for (int32_t m = 0; m < N; ++m) {
        long double sum = v[0];
        for (int32_t k = 1; k < h; ++k)
            sum += 2 * v[k] * std::cos(2 * std::numbers::pi_v<long double> * k * m / N);
        out[m] = static_cast<double>(sum / N);
    }
    return 0;
}

Status DirectInverseCosine(double* v, int32_t h, double* out) {
    for (int32_t m = 0; m < h; ++m) {
        long double sum = v[0] * std::sqrt(1.0L / h);
        for (int32_t k = 1; k < h; ++k)
            sum += std::sqrt(2.0L / h) * v[k] *
                   std::cos(std::numbers::pi_v<long double> * k * (2 * m + 1) / (2 * h));
        out[m] = static_cast<double>(sum);
    }
    return 0;
}

Status Refuse(double*, int32_t, double*) { return InternalErr; }

constexpr tw::ChebyshevTransforms kDirect{DirectInverseReal, DirectInverseCosine};

// The cosines come from the Chebyshev three-term recursion, whose error grows with the index and
// is amplified by the polynomial of degree N-1: measured up to 2.4e-12 at n = 64 and 1.3e-10 at
// n = 200, against 1e-13 with a cosine per sample. Hence a tolerance growing as n cubed.
TEST(DolphChebyshev, MatchesTheReferenceWindows) {
    for (const ChebwinCase& c : kChebwin) {
        const double tolerance = 1e-14 + 2e-17 * c.n * c.n * c.n;
        SCOPED_TRACE(::testing::Message() << "n " << c.n << " s " << c.s << " symmetric " << c.symmetric);
        std::vector<double> x(static_cast<size_t>(c.n), 1.0);
        ASSERT_EQ(tw::DolphChebyshevWindow(x.data(), c.n, c.s, c.symmetric, kDirect), 0);
        double peak = 0;
        for (int32_t i = 0; i < c.n; ++i) {
            EXPECT_NEAR(x[i], c.w[i], tolerance) << i;
            peak = std::max(peak, x[i]);
        }
        EXPECT_NEAR(peak, 1.0, 2.3e-16);
    }
}

TEST(DolphChebyshev, RatioBelowOneCountsAsOne) {
    for (double s : {0.0, 0.5, -3.0, std::nan("")}) {
        std::vector<double> low(9, 1.0), one(9, 1.0);
        ASSERT_EQ(tw::DolphChebyshevWindow(low.data(), 9, s, 1, kDirect), 0);
        ASSERT_EQ(tw::DolphChebyshevWindow(one.data(), 9, 1.0, 1, kDirect), 0);
        EXPECT_EQ(low, one);
    }
}

TEST(DolphChebyshev, ComplexTwinScalesBothParts) {
    std::vector<std::complex<double>> z(12);
    std::vector<double> re(12), im(12);
    for (int i = 0; i < 12; ++i) {
        z[i] = {i - 3.5, 0.25 * i * i};
        re[i] = z[i].real();
        im[i] = z[i].imag();
    }
    ASSERT_EQ(tw::DolphChebyshevWindow(z.data(), 12, 300.0, 0, kDirect), 0);
    ASSERT_EQ(tw::DolphChebyshevWindow(re.data(), 12, 300.0, 0, kDirect), 0);
    ASSERT_EQ(tw::DolphChebyshevWindow(im.data(), 12, 300.0, 0, kDirect), 0);
    for (int i = 0; i < 12; ++i) {
        EXPECT_EQ(z[i].real(), re[i]);
        EXPECT_EQ(z[i].imag(), im[i]);
    }
}

TEST(DolphChebyshev, EdgeLengthsAndTransformFailure) {
    std::vector<double> x{2.5};
    EXPECT_EQ(tw::DolphChebyshevWindow(x.data(), 1, 1000.0, 0, kDirect), 0);
    EXPECT_EQ(x[0], 2.5);
    EXPECT_EQ(tw::DolphChebyshevWindow(x.data(), 0, 1000.0, 0, kDirect), EmptyArrayErr);
    // A failing transform hands its status on; both parities reach their transform.
    const tw::ChebyshevTransforms refusing{Refuse, Refuse};
    std::vector<double> y(6, 1.0);
    EXPECT_EQ(tw::DolphChebyshevWindow(y.data(), 6, 1000.0, 0, refusing), InternalErr);
    EXPECT_EQ(tw::DolphChebyshevWindow(y.data(), 6, 1000.0, 1, refusing), InternalErr);
}

}  // namespace
