// Carries near the i32 limit and states no call leaves: the counts stay in range and the
// resampler's fraction stays in [0, 1).
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include "twanlys/signal.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using V = std::vector<double>;
constexpr int32_t kMax = std::numeric_limits<int32_t>::max();

TEST(Carry, BlockSumCountAtTheLimitStaysInRange) {
    Array1D<double> x(V{1, 2, 3, 4, 5});
    double sum = 0;
    int32_t count = kMax, produced = -1;
    ReDecimatedMovingAverageH(x.h(), 2, &sum, &count, 0, &produced);
    EXPECT_GE(count, 0);
    EXPECT_LT(count, 2);
    EXPECT_GE(produced, 1);
    EXPECT_LE(produced, 5);
}

TEST(Carry, AveragingPartialAtTheLimitDoesNotWrap) {
    // offset past the block: nothing completes and the block is only summed.
    Array1D<double> x(V{1, 2, 3, 4});
    int32_t offset = 10, partial = kMax;
    double sum = 0;
    ASSERT_EQ(DecimateContinuous_H(x.h(), 3, 1, &offset, 0, &partial, &sum), 0);
    EXPECT_EQ(x.size(), 0);
    EXPECT_GE(partial, 0);
    EXPECT_EQ(offset, 6);
    EXPECT_EQ(sum, 10.0);
}

TEST(Carry, ConstantRatioFractionStaysInTheUnitInterval) {
    const Array1D<double> table(V{0.25, 0.5, 0.25});
    Array1D<double> buffer, coefs;
    ResampleState state{};
    state.buffer = buffer.h();
    state.coefs = coefs.h();
    // A ratio so large that the second output's index saturates.
    const ResampleSettings huge{1e308, 0, 0.0, table.h(), 1};
    Array1D<double> y;
    int32_t produced = -1;
    ASSERT_EQ(Resample_Const(Array1D<double>(V{1, 2, 3, 4}).h(), &state, &huge, 1, y.h(), &produced, 0), 0);
    EXPECT_EQ(produced, 1);
    EXPECT_GE(state.frac, 0.0);
    EXPECT_LT(state.frac, 1.0);

    // A carried fraction that no call leaves is refused, and the state zeroed.
    state.frac = std::numeric_limits<double>::quiet_NaN();
    EXPECT_EQ(Resample_Const(Array1D<double>(V{1, 2}).h(), &state, &huge, 0, y.h(), &produced, 0), -20140);
    EXPECT_EQ(state.frac, 0.0);
    EXPECT_EQ(state.ratio, 0.0);
    EXPECT_EQ(buffer.size(), 0);
}

}  // namespace
