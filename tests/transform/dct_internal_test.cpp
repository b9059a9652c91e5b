// The cosine and sine cores on strided and aliased data, and the inverse transforms of the
// Dolph-Chebyshev window against direct sums in long double.
#include <gtest/gtest.h>

#include <cmath>
#include <numbers>
#include <vector>

#include "transform/dct.hpp"
#include "window/dolph_chebyshev.hpp"

namespace {

using tw::TrigKind;

constexpr TrigKind kKinds[] = {TrigKind::CosForward, TrigKind::CosInverse, TrigKind::SinForward,
                               TrigKind::SinInverse};

struct Table {
    explicit Table(int32_t n) : t(tw::CreateFftTable(n)) {}
    ~Table() { tw::DestroyFftTable(t); }
    FftTable* t;
};

// A matrix column is transformed in place at its stride exactly as the same values contiguously;
// values beyond count read as zeros.
TEST(TrigCore, StridedInPlaceEqualsContiguous) {
    for (TrigKind kind : kKinds) {
        for (int32_t n : {1, 2, 3, 4, 5, 8, 9, 16, 17, 53, 106}) {
            SCOPED_TRACE(::testing::Message() << "kind " << static_cast<int>(kind) << " n " << n);
            const Table table(tw::TrigTableLength(kind, n));
            ASSERT_NE(table.t, nullptr);
            const int32_t count = n > 2 ? n - 2 : n;
            std::vector<double> x(static_cast<size_t>(n)), y(static_cast<size_t>(n), 7.0);
            constexpr ptrdiff_t kStride = 3;
            std::vector<double> column(static_cast<size_t>(n * kStride), -1.0);
            for (int32_t j = 0; j < n; ++j) {
                x[j] = j < count ? std::sin(1.3 * j) + 0.5 : 0.0;
                if (j < count) column[j * kStride] = x[j];
            }
            ASSERT_EQ(tw::TrigTransform(kind, table.t, x.data(), n, y.data(), n), 0);
            std::vector<double> work(tw::TrigWorkLength(kind, n));
            ASSERT_EQ(tw::TrigTransformStrided(kind, table.t, column.data(), count, kStride, column.data(),
                                               kStride, n, work.data()),
                      0);
            for (int32_t k = 0; k < n; ++k) EXPECT_EQ(column[k * kStride], y[k]) << k;
            for (size_t i = 0; i < column.size(); ++i) {
                if (i % kStride != 0) {
                    EXPECT_EQ(column[i], -1.0) << "outside the column " << i;
                }
            }
        }
    }
}

long double Pi() { return std::numbers::pi_v<long double>; }

TEST(ChebyshevTransforms, InverseRealIsTheInverseDftOfAnEvenSpectrum) {
    for (int32_t N : {1, 3, 5, 9, 17, 53, 65, 101}) {
        const int32_t h = (N + 1) / 2;
        std::vector<double> v(static_cast<size_t>(h)), out(static_cast<size_t>(N));
        for (int32_t k = 0; k < h; ++k) v[k] = std::cos(0.4 * k) + 1.5;
        const std::vector<double> spectrum = v;
        ASSERT_EQ(tw::kChebyshevTransforms.inverseReal(v.data(), N, out.data()), 0);
        for (int32_t m = 0; m < N; ++m) {
            long double sum = spectrum[0];
            for (int32_t k = 1; k < h; ++k) sum += 2 * spectrum[k] * std::cos(2 * Pi() * k * m / N);
            EXPECT_NEAR(out[m], static_cast<double>(sum / N), 1e-15 * h) << "N " << N << " m " << m;
        }
    }
}

TEST(ChebyshevTransforms, InverseCosineIsTheOrthonormalTypeThree) {
    for (int32_t h : {1, 2, 3, 4, 8, 9, 32, 33, 50}) {
        std::vector<double> v(static_cast<size_t>(h)), out(static_cast<size_t>(h));
        for (int32_t k = 0; k < h; ++k) v[k] = 1.0 / (1 + k) - 0.1 * k;
        const std::vector<double> coefficients = v;
        ASSERT_EQ(tw::kChebyshevTransforms.inverseCosine(v.data(), h, out.data()), 0);
        for (int32_t m = 0; m < h; ++m) {
            long double sum = coefficients[0] * std::sqrt(1.0L / h);
            for (int32_t k = 1; k < h; ++k)
                sum += std::sqrt(2.0L / h) * coefficients[k] * std::cos(Pi() * k * (2 * m + 1) / (2 * h));
            EXPECT_NEAR(out[m], static_cast<double>(sum), 1e-15 * h) << "h " << h << " m " << m;
        }
    }
}

}  // namespace
