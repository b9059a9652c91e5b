// White-box tests of the FFT core: factorisation, the shared table list, strides, and exact
// small cases. Reference values come from a direct DFT in extended precision.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <numbers>
#include <vector>

#include "transform/fft/fft.hpp"
#include "twrt.h"

namespace {

using tw::FftTable;
using cld = std::complex<long double>;

std::vector<cld> DirectDft(const std::vector<cld>& x) {
    const size_t n = x.size();
    std::vector<cld> y(n);
    for (size_t k = 0; k < n; ++k) {
        cld acc = 0;
        for (size_t j = 0; j < n; ++j) {
            const long double a = -2 * std::numbers::pi_v<long double> * static_cast<long double>((j * k) % n) / n;
            acc += x[j] * cld(std::cos(a), std::sin(a));
        }
        y[k] = acc;
    }
    return y;
}

std::vector<cld> Signal(size_t n, bool real) {
    std::vector<cld> x(n);
    for (size_t i = 0; i < n; ++i)
        x[i] = cld(std::sin(1.3L * i + 0.2L) + 0.5L * std::cos(0.37L * i * i),
                   real ? 0.0L : std::cos(2.1L * i) - 0.25L);
    return x;
}

struct Table {
    explicit Table(int32_t n) : t(tw::CreateFftTable(n)) {}
    ~Table() { tw::DestroyFftTable(t); }
    FftTable* t;
};

TEST(FftFactorise, GreedyWalkThenAscendingOrder) {
    struct Case {
        int32_t n;
        std::vector<int32_t> factors;
        std::vector<int32_t> kinds;
    };
    const std::vector<Case> cases = {
        {1, {}, {}},
        {1000, {10, 10, 10}, {0, 0, 0}},
        {1024, {32, 32}, {0, 0}},
        {2048, {2, 32, 32}, {0, 0, 0}},
        {4096, {4, 32, 32}, {0, 0, 0}},
        {48, {3, 16}, {0, 0}},
        {36, {2, 18}, {0, 0}},
        {60, {2, 3, 10}, {0, 0, 0}},
        {23, {23}, {1}},
        {529, {23, 23}, {1, 1}},
        {53, {53}, {2}},
        {106, {2, 53}, {0, 2}},
        {2809, {53, 53}, {2, 2}},
        {47 * 59 * 3, {3, 47, 59}, {0, 1, 2}},
    };
    for (const Case& c : cases) {
        int32_t f[tw::kFftMaxStages], k[tw::kFftMaxStages];
        const int32_t count = tw::FftFactorise(c.n, f, k);
        EXPECT_EQ(std::vector<int32_t>(f, f + count), c.factors) << c.n;
        EXPECT_EQ(std::vector<int32_t>(k, k + count), c.kinds) << c.n;
    }
}

TEST(FftTables, SharedByLengthAndCounted) {
    const int64_t hostBlocks = TWRTAllocCount();
    EXPECT_EQ(tw::CreateFftTable(0), nullptr);
    EXPECT_EQ(tw::CreateFftTable(-5), nullptr);
    tw::DestroyFftTable(nullptr);
    FftTable* a = tw::CreateFftTable(1000);
    FftTable* b = tw::CreateFftTable(1000);
    ASSERT_NE(a, nullptr);
    EXPECT_EQ(a, b);
    EXPECT_EQ(a->refs, 2);
    tw::DestroyFftTable(b);
    EXPECT_EQ(a->refs, 1);
    EXPECT_EQ(a->size, 1000);
    tw::DestroyFftTable(a);
    EXPECT_EQ(TWRTAllocCount(), hostBlocks) << "tables live on the plain heap, never in host blocks";
}

TEST(FftTables, LengthOneHasNoStages) {
    Table t(1);
    ASSERT_NE(t.t, nullptr);
    EXPECT_EQ(t.t->stageCount, 0);
    const double in = 4.5;
    double out = 0;
    EXPECT_EQ(tw::FftRealForward(t.t, &in, &out, 1, 1, 1), 0);
    EXPECT_EQ(out, 4.5);
}

TEST(FftTables, RaderStagesShareTheirSubTable) {
    Table t53(53), t2809(2809);
    ASSERT_NE(t53.t, nullptr);
    ASSERT_NE(t2809.t, nullptr);
    const FftTable* sub = t53.t->stages[0]->raderTable;
    ASSERT_NE(sub, nullptr);
    EXPECT_EQ(sub->size, 52);
    EXPECT_EQ(std::vector<int32_t>(sub->factors, sub->factors + sub->stageCount), (std::vector<int32_t>{4, 13}));
    EXPECT_EQ(t2809.t->stages[0]->raderTable, sub);
    EXPECT_EQ(t2809.t->stages[1]->raderTable, sub);
    EXPECT_EQ(sub->refs, 3);
}

TEST(FftTables, TwiddlesFollowTheirAnglesClosely) {
    Table t(1 << 20);
    ASSERT_NE(t.t, nullptr);
    const int32_t r = t.t->factors[0], n = t.t->size, m = n / r;
    const tw::FftStage* st = t.t->stages[0];
    long double worst = 0;
    for (int32_t j = 1; j < m; j += 97) {
        for (int32_t k = 1; k < r; ++k) {
            const long double a = -2 * std::numbers::pi_v<long double> * (static_cast<long double>(j) * k) / n;
            const size_t i = static_cast<size_t>(j - 1) * (r - 1) + (k - 1);
            worst = std::max(worst, std::abs(cld(st->twiddleRe[i], st->twiddleIm[i]) - cld(std::cos(a), std::sin(a))));
        }
    }
    EXPECT_LT(static_cast<double>(worst), 1e-14);
}

TEST(FftNextFastSize, MatchesAScanOverTheCodeletPrimes) {
    auto smooth = [](int64_t m) {
        for (int p : {2, 3, 5, 7, 11, 13, 17, 19, 29, 31, 37, 41, 43})
            while (m % p == 0) m /= p;
        return m == 1;
    };
    for (int32_t n = 1; n <= 3000; ++n) {
        int32_t want = n;
        while (!smooth(want)) ++want;
        ASSERT_EQ(tw::FftNextFastSize(n), want) << n;
    }
    for (int32_t n : {1000003, 999983, 1 << 30}) {
        int32_t want = n;
        while (!smooth(want)) ++want;
        EXPECT_EQ(tw::FftNextFastSize(n), want) << n;
    }
    EXPECT_EQ(tw::FftNextFastSize(0), 1);
}

// Complex data in matrix columns (stride 3) and real data with a gap between elements.
TEST(FftTransforms, StridedDataMatchTheDirectDft) {
    for (int32_t n : {2, 3, 5, 7, 12, 16, 23, 43, 53, 60, 64, 97, 106, 210, 529}) {
        Table t(n);
        ASSERT_NE(t.t, nullptr);
        const std::vector<cld> x = Signal(static_cast<size_t>(n), false);
        const std::vector<cld> want = DirectDft(x);
        std::vector<double> in(3 * static_cast<size_t>(n) * 2, 99.0), out(2 * in.size(), -7.0);
        for (int32_t i = 0; i < n; ++i) {
            in[static_cast<size_t>(6 * i)] = static_cast<double>(x[i].real());
            in[static_cast<size_t>(6 * i + 3)] = static_cast<double>(x[i].imag());
        }
        ASSERT_EQ(tw::FftComplexForward(t.t, in.data(), in.data() + 3, out.data(), out.data() + 5, 6, 10, n), 0);
        long double err = 0, scale = 0;
        for (int32_t k = 0; k < n; ++k) {
            const cld got(out[static_cast<size_t>(10 * k)], out[static_cast<size_t>(10 * k + 5)]);
            err = std::max(err, std::abs(got - want[k]));
            scale = std::max(scale, std::abs(want[k]));
        }
        EXPECT_LT(static_cast<double>(err / scale), 1e-14) << n;
        EXPECT_EQ(out[1], -7.0);

        const std::vector<cld> xr = Signal(static_cast<size_t>(n), true);
        const std::vector<cld> wr = DirectDft(xr);
        std::vector<double> rin(2 * static_cast<size_t>(n)), rout(3 * static_cast<size_t>(n));
        for (int32_t i = 0; i < n; ++i) rin[static_cast<size_t>(2 * i)] = static_cast<double>(xr[i].real());
        ASSERT_EQ(tw::FftRealForward(t.t, rin.data(), rout.data(), 2, 3, n), 0);
        err = std::abs(rout[0] - wr[0].real());
        for (int32_t k = 1; 2 * k < n; ++k) {
            err = std::max(err, std::abs(rout[static_cast<size_t>(3 * k)] - wr[k].real()));
            err = std::max(err, std::abs(rout[static_cast<size_t>(3 * (n - k))] - wr[k].imag()));
        }
        if (n % 2 == 0) err = std::max(err, std::abs(rout[static_cast<size_t>(3 * (n / 2))] - wr[n / 2].real()));
        EXPECT_LT(static_cast<double>(err / scale), 1e-14) << n;
    }
}

TEST(FftTransforms, SmallRealLengthsRoundAsWritten) {
    Table t2(2), t3(3);
    const double x2[2] = {0.1, 0.7};
    double y2[2];
    tw::FftRealForward(t2.t, x2, y2, 1, 1, 2);
    EXPECT_EQ(y2[0], 0.1 + 0.7);
    EXPECT_EQ(y2[1], 0.1 - 0.7);
    const double x3[3] = {0.3, 1.1, -0.45};
    double y3[3];
    tw::FftRealForward(t3.t, x3, y3, 1, 1, 3);
    const double s = 1.1 + -0.45;
    EXPECT_EQ(y3[0], 0.3 + s);
    EXPECT_EQ(y3[1], (0.3 + s) + -1.5 * s);
    EXPECT_EQ(y3[2], 0.8660254037844386 * (-0.45 - 1.1));
}

TEST(FftTransforms, RaderImpulseAndConstant) {
    for (int32_t p : {53, 59, 61}) {
        Table t(p);
        std::vector<double> re(static_cast<size_t>(p), 0.0), im(re), yr(re), yi(re);
        re[0] = 1;
        ASSERT_EQ(tw::FftComplexForward(t.t, re.data(), im.data(), yr.data(), yi.data(), 1, 1, p), 0);
        for (int32_t k = 0; k < p; ++k) {
            EXPECT_NEAR(yr[k], 1.0, 4e-16) << p;
            EXPECT_NEAR(yi[k], 0.0, 4e-16) << p;
        }
        std::fill(re.begin(), re.end(), 1.0);
        ASSERT_EQ(tw::FftComplexForward(t.t, re.data(), im.data(), yr.data(), yi.data(), 1, 1, p), 0);
        EXPECT_EQ(yr[0], p);
        for (int32_t k = 1; k < p; ++k) EXPECT_NEAR(std::abs(std::complex<double>(yr[k], yi[k])), 0.0, 1e-13);
    }
}

TEST(FftTransforms, SizeMismatchIsRefusedWithTheTwoStatuses) {
    Table t(8);
    std::vector<double> a(16), b(16);
    EXPECT_EQ(tw::FftRealForward(t.t, a.data(), b.data(), 1, 1, 9), InternalErr);
    EXPECT_EQ(tw::FftComplexForward(t.t, a.data(), a.data() + 1, b.data(), b.data() + 1, 2, 2, 7), -1);
    EXPECT_EQ(tw::FftRealForward(nullptr, a.data(), b.data(), 1, 1, 8), InternalErr);
}

TEST(FftPacking, CentredUnpackAndPackAreInverse) {
    // Half-complex of length 4: X0 = 1, X1 = 2 + 3i, X2 = 4.
    const double half[4] = {1, 2, 4, 3};
    std::complex<double> cells[4];
    tw::FftUnpackHalfComplex(half, 4, 1, cells);
    EXPECT_EQ(cells[2], std::complex<double>(1, 0));
    EXPECT_EQ(cells[0], std::complex<double>(4, 0));
    EXPECT_EQ(cells[3], std::complex<double>(2, 3));
    EXPECT_EQ(cells[1], std::complex<double>(2, -3));
    for (int32_t n : {1, 2, 5, 6}) {
        for (int32_t shift : {0, 1}) {
            std::vector<std::complex<double>> c(static_cast<size_t>(n));
            std::vector<double> h(static_cast<size_t>(n)), back(h.size());
            for (int32_t i = 0; i < n; ++i) h[i] = 0.5 + i * i;
            tw::FftUnpackHalfComplex(h.data(), n, shift, c.data());
            tw::FftPackHalfComplex(c.data(), n, shift, back.data());
            EXPECT_EQ(back, h) << n << " " << shift;
        }
    }
}

}  // namespace
