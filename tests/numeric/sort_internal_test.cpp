// The shared sorts against std::sort, on the inputs that break careless partitions.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <random>
#include <vector>

#include "numeric/sort.hpp"

namespace {

using V = std::vector<double>;
const double kNaN = std::numeric_limits<double>::quiet_NaN();

// Ascending with NaN first: the order the sorts promise.
V Expected(V v) {
    std::stable_partition(v.begin(), v.end(), [](double a) { return std::isnan(a); });
    auto firstNumber = std::find_if(v.begin(), v.end(), [](double a) { return !std::isnan(a); });
    std::sort(firstNumber, v.end());
    return v;
}

bool SameValues(const V& a, const V& b) {
    if (a.size() != b.size()) return false;
    for (size_t i = 0; i < a.size(); ++i)
        if (!(a[i] == b[i] || (std::isnan(a[i]) && std::isnan(b[i])))) return false;
    return true;
}

std::vector<V> Inputs() {
    std::mt19937_64 rng(33);
    std::uniform_real_distribution<double> u(-1, 1);
    std::vector<V> inputs = {{}, {5}, {2, 1}, {1, 2, 3, 4, 5, 6, 7}, {7, 6, 5, 4, 3, 2, 1, 0},
                             {kNaN, 1, kNaN, -1, 0, -0.0, 3, kNaN, 2, 9}, {kNaN, kNaN, kNaN}};
    for (int n : {8, 9, 15, 16, 17, 100, 1001, 50000}) {
        V random(n), sorted(n), reversed(n), equal(n, 4.5), few(n), organ(n);
        for (int i = 0; i < n; ++i) {
            random[i] = u(rng);
            sorted[i] = i;
            reversed[i] = n - i;
            few[i] = static_cast<double>((i * 7919) % 3);
            organ[i] = i < n / 2 ? i : n - i;
        }
        inputs.insert(inputs.end(), {random, sorted, reversed, equal, few, organ});
        random[n / 3] = kNaN;
        random[n - 1] = -std::numeric_limits<double>::infinity();
        inputs.push_back(random);
    }
    return inputs;
}

TEST(Sort, PlainAndPairedAgreeWithStdSort) {
    for (const V& input : Inputs()) {
        const V expected = Expected(input);
        const int32_t n = static_cast<int32_t>(input.size());
        V plain = input;
        EXPECT_EQ(tw::SortAscending(plain.data(), n), 0);
        EXPECT_TRUE(SameValues(plain, expected)) << n;

        // Carry each element's index: the pairs must stay together.
        V key = input, carried(input.size());
        for (int32_t i = 0; i < n; ++i) carried[i] = i;
        EXPECT_EQ(tw::SortAscendingPaired(key.data(), carried.data(), n, 2 * n / 7 + 2), 0);
        EXPECT_TRUE(SameValues(key, expected)) << n;
        std::vector<bool> seen(input.size(), false);
        for (int32_t i = 0; i < n; ++i) {
            const auto from = static_cast<size_t>(carried[i]);
            ASSERT_FALSE(seen[from]);
            seen[from] = true;
            EXPECT_TRUE(SameValues({key[i]}, {input[from]}));
        }
    }
}

TEST(Sort, StackHoldsOnlyTheLargerSegments) {
    // Waiting segments never exceed log2(n), whatever the data.
    for (const V& input : Inputs()) {
        const int32_t n = static_cast<int32_t>(input.size());
        if (n < 2) continue;
        const auto depth = static_cast<int32_t>(std::ceil(std::log2(n)));
        V key = input, carried = input;
        EXPECT_EQ(tw::SortAscendingPaired(key.data(), carried.data(), n, 2 * depth), 0) << n;
    }
    struct Case {
        int32_t n, capacity, status;
    };
    const Case cases[] = {
        {7, 0, 0},                          // insertion sort only: no stack
        {8, 0, BufferTooSmallErr},      // one partition needs one waiting segment
        {8, 1, BufferTooSmallErr},
        {8, 2, 0},
        {1000, 2, BufferTooSmallErr},
    };
    for (const Case& c : cases) {
        V key(c.n), carried(c.n);
        for (int32_t i = 0; i < c.n; ++i) key[i] = (i * 37) % 11;
        EXPECT_EQ(tw::SortAscendingPaired(key.data(), carried.data(), c.n, c.capacity), c.status) << c.n;
    }
}

}  // namespace
