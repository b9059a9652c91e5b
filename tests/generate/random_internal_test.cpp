#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "generate/random.hpp"

namespace {

#include "wichmann_hill_reference.inc"

using tw::RandomInt15;
using tw::RandomSeed;
using tw::RandomUniform;

RandomState Seeded(int32_t seed) {
    RandomState st{123, 456, 789};
    RandomSeed(seed, &st);
    return st;
}

TEST(RandomSource, StreamsMatchTheReference) {
    for (const StreamCase& c : kStreams) {
        SCOPED_TRACE(c.seed);
        RandomState st = Seeded(c.seed);
        for (double expected : c.uniform) ASSERT_EQ(RandomUniform(&st), expected);
        st = Seeded(c.seed);
        for (int32_t expected : c.int15) ASSERT_EQ(RandomInt15(&st), expected);
        st = Seeded(c.seed);
        double last = 0;
        for (int i = 0; i < kLongRun; ++i) {
            last = RandomUniform(&st);
            ASSERT_GE(last, 0.0);
            ASSERT_LT(last, 1.0);
        }
        EXPECT_EQ(last, c.lastOfRun);
        EXPECT_EQ(st.s1, c.stateAfterRun[0]);
        EXPECT_EQ(st.s2, c.stateAfterRun[1]);
        EXPECT_EQ(st.s3, c.stateAfterRun[2]);
    }
}

TEST(RandomSource, SeedRule) {
    const RandomState one = Seeded(1);
    EXPECT_EQ(one.s1, 1);
    EXPECT_EQ(one.s2, 8191);
    EXPECT_EQ(one.s3, 1);

    // A multiple of 16384 zeroes the last two components for good; only s1 moves.
    RandomState st = Seeded(3 * 16384);
    EXPECT_EQ(st.s2, 0);
    EXPECT_EQ(st.s3, 0);
    for (int i = 0; i < 1000; ++i) {
        const double expected =
            static_cast<double>(static_cast<int32_t>(st.s1 * 171 % 30269)) * 3.3037100664045725e-05;
        const double u = RandomUniform(&st);
        ASSERT_EQ(st.s2, 0);
        ASSERT_EQ(st.s3, 0);
        ASSERT_EQ(u, expected - static_cast<int64_t>(expected));
    }

    // Seed 0 continues; the seed rule of the generators continues for negative seeds as well.
    st = Seeded(77);
    RandomUniform(&st);
    RandomState cont = st, neg = st;
    RandomSeed(0, &cont);
    tw::ApplySeed(-5, &neg);
    const double next = RandomUniform(&st);
    EXPECT_EQ(RandomUniform(&cont), next);
    EXPECT_EQ(RandomUniform(&neg), next);
    // A positive seed restarts whatever the record held.
    RandomState a{0, 0, 0}, b{5, 6, 7};
    tw::ApplySeed(4242, &a);
    tw::ApplySeed(4242, &b);
    for (int i = 0; i < 10; ++i) ASSERT_EQ(RandomUniform(&a), RandomUniform(&b));
}

TEST(RandomSource, ZeroRecordStaysAtZero) {
    RandomState st{0, 0, 0};
    for (int i = 0; i < 100; ++i) {
        ASSERT_EQ(RandomUniform(&st), 0.0);
        ASSERT_EQ(RandomInt15(&st), 0);
    }
}

// Chi-square over 100 equal bins of 10^6 draws, 99 degrees of freedom. The band holds 99.9% of
// the distribution (chi2.ppf(0.0005, 99) and chi2.ppf(0.9995, 99) from SciPy).
TEST(RandomSource, UniformityChiSquare) {
    constexpr int kDraws = 1000000, kBins = 100;
    for (int32_t seed : {1, 31337, 2147483647}) {
        RandomState st = Seeded(seed);
        std::vector<int> counts(kBins, 0);
        for (int i = 0; i < kDraws; ++i) ++counts[static_cast<size_t>(RandomUniform(&st) * kBins)];
        const double expected = static_cast<double>(kDraws) / kBins;
        double chi2 = 0;
        for (int c : counts) chi2 += (c - expected) * (c - expected) / expected;
        RecordProperty("chi2_seed_" + std::to_string(seed), std::to_string(chi2));
        std::printf("chi-square seed %d: %.3f\n", seed, chi2);
        EXPECT_GT(chi2, 59.12818798991772) << "seed " << seed;
        EXPECT_LT(chi2, 151.93401121930782) << "seed " << seed;
    }
}

}  // namespace
