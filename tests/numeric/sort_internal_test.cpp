// The shared sorts against std::sort, on inputs that break careless partitions.
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

std::vector<V> Inputs() {
    std::mt19937_64 rng(33);
    std::vector<V> inputs = {{}, {5}, {2, 1}, {7, 6, 5, 4, 3, 2, 1, 0}, {kNaN, 1, kNaN, -1, -0.0, 3, kNaN, 2, 9}};
    for (int n : {8, 9, 17, 100, 1001, 50000}) {
        V random(n), sorted(n), reversed(n), equal(n, 4.5), few(n), organ(n);
        for (int i = 0; i < n; ++i) {
            random[i] = std::uniform_real_distribution<double>(-1, 1)(rng);
            sorted[i] = i;
            reversed[i] = n - i;
            few[i] = (i * 7919) % 3;
            organ[i] = i < n / 2 ? i : n - i;
        }
        random[n / 3] = kNaN;
        inputs.insert(inputs.end(), {random, sorted, reversed, equal, few, organ});
    }
    return inputs;
}

TEST(Sort, AgreesWithStdSortAndKeepsPairsTogether) {
    for (const V& input : Inputs()) {
        const auto n = static_cast<int32_t>(input.size());
        V expected = input;  // NaN first, then ascending
        const auto numbers = std::stable_partition(expected.begin(), expected.end(), [](double a) { return std::isnan(a); });
        std::sort(numbers, expected.end());
        const auto same = [](double a, double b) { return a == b || (std::isnan(a) && std::isnan(b)); };

        V plain = input;
        EXPECT_EQ(tw::SortAscending(plain.data(), n), 0);
        EXPECT_TRUE(std::equal(plain.begin(), plain.end(), expected.begin(), same)) << n;

        // Carry each element's index; a capacity of 2 log2(n) words must do whatever the data.
        V key = input, carried(input.size());
        for (int32_t i = 0; i < n; ++i) carried[i] = i;
        const int32_t words = n < 2 ? 0 : 2 * static_cast<int32_t>(std::ceil(std::log2(n)));
        EXPECT_EQ(tw::SortAscendingPaired(key.data(), carried.data(), n, words), 0) << n;
        EXPECT_TRUE(std::equal(key.begin(), key.end(), expected.begin(), same)) << n;
        V order = carried;
        std::sort(order.begin(), order.end());
        for (int32_t i = 0; i < n; ++i) {
            EXPECT_EQ(order[i], i);
            EXPECT_TRUE(same(key[i], input[static_cast<size_t>(carried[i])]));
        }
    }
}

TEST(Sort, CapacityExceeded) {
    struct Case {
        int32_t n, capacity, status;
    };
    const Case cases[] = {{7, 0, 0}, {8, 1, BufferTooSmallErr}, {8, 2, 0}, {1000, 2, BufferTooSmallErr}};
    for (const Case& c : cases) {
        V key(c.n), carried(c.n);
        for (int32_t i = 0; i < c.n; ++i) key[i] = (i * 37) % 11;
        EXPECT_EQ(tw::SortAscendingPaired(key.data(), carried.data(), c.n, c.capacity), c.status) << c.n;
    }
}

}  // namespace
