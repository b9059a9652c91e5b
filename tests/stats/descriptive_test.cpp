#include <gtest/gtest.h>

#include <cmath>

#include "twanlys/stats.h"
#include "twrt.hpp"

namespace {

TEST(Median, EvenCountAveragesTheMiddlePair) {
    const twrt::Array1D<double> x{3, 1, 2, 4};
    double median = 0;
    int32_t status = -1;
    EXPECT_EQ(Median_head(x.h(), &median, &status), 0);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(median, 2.5);
}

}  // namespace
