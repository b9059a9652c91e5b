// Statistics exports: the stated quirks, with values derived by hand.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "common/helpers.hpp"
#include "twanlys/stats.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using V = std::vector<double>;
const double kNaNIn = std::numeric_limits<double>::quiet_NaN();

class Stats : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(Stats, Median) {
    struct Case {
        V x;
        int32_t status;
        double median;
    };
    const Case cases[] = {
        {{3, 1, 2, 4}, 0, 2.5},
        {{5}, 0, 5},
        {{9, -1, 4, 4, 7}, 0, 4},
        {{2, 2, 2, 2, 1, 1, 1, 1}, 0, 1.5},
        {{6, 5, 4, 3, 2, 1}, 0, 3.5},
    };
    for (const Case& c : cases) {
        const Array1D<double> x(c.x);
        double median = 0;
        int32_t status = -1;
        Median_head(x.h(), &median, &status);
        EXPECT_EQ(status, c.status);
        EXPECT_EQ(median, c.median);
    }
    const Array1D<double> withNaN{1, kNaNIn, 3};
    double median = 0;
    int32_t status = 0;
    Median_head(withNaN.h(), &median, &status);
    EXPECT_EQ(status, BoundsNanErr);
    EXPECT_TRUE(twtest::IsFailureNaN(median));
}

TEST_P(Stats, MedianOfLargeDataAgreesWithAFullSort) {
    // Many duplicates and a sorted run: the inputs that break a careless partition.
    V v;
    for (int i = 0; i < 10001; ++i) v.push_back(static_cast<double>((i * 7919) % 101));
    for (int i = 0; i < 999; ++i) v.push_back(i);
    V sorted = v;
    std::sort(sorted.begin(), sorted.end());
    const size_t k = v.size() / 2;
    const double expected = (sorted[k - 1] + sorted[k]) * 0.5;
    const Array1D<double> x(v);
    double median = 0;
    int32_t status = -1;
    Median_head(x.h(), &median, &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(median, expected);
}

TEST_P(Stats, MomentNormalisesByNAndRejectsOrderZero) {
    const Array1D<double> x{1, 2, 3, 4};
    double m = 0;
    int32_t status = -1, order = 2;
    Moment_head(x.h(), &order, &m, &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(m, 1.25);  // population variance
    order = 3;
    Moment_head(x.h(), &order, &m, &status);
    EXPECT_EQ(m, 0.0);   // symmetric data
    order = 4;
    Moment_head(x.h(), &order, &m, &status);
    EXPECT_EQ(m, (2 * 5.0625 + 2 * 0.0625) / 4);
    order = 0;
    Moment_head(x.h(), &order, &m, &status);
    EXPECT_EQ(status, OrderNotPositiveErr);
    EXPECT_TRUE(twtest::IsFailureNaN(m));
}

TEST_P(Stats, MseUsesTheExpandedSquare) {
    // (y - 2x) y + x^2 with x = 1, y = 1 + 2^-52 rounds to exactly 0, while (x - y)^2 = 2^-104.
    const Array1D<double> x{1.0}, y{1.0 + std::ldexp(1.0, -52)};
    double mse = 1;
    int32_t status = -1;
    MSE_head(x.h(), y.h(), &mse, &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(mse, 0.0);

    const Array1D<double> empty;
    MSE_head(x.h(), empty.h(), &mse, &status);
    EXPECT_EQ(status, EmptyArrayErr);
    EXPECT_TRUE(twtest::IsFailureNaN(mse));
}

TEST_P(Stats, RmsRealAndComplex) {
    const Array1D<double> x{3, -4};
    double rms = 0;
    int32_t status = -1;
    RMS_head(x.h(), &rms, &status);
    EXPECT_EQ(rms, std::sqrt(12.5));
    const Array1D<std::complex<double>> z{{3, 4}, {0, 0}};
    EXPECT_EQ(CxRMS_head(z.h(), &rms), 0);
    EXPECT_EQ(rms, std::sqrt(12.5));
    const Array1D<std::complex<double>> none;
    EXPECT_EQ(CxRMS_head(none.h(), &rms), EmptyArrayErr);
    EXPECT_TRUE(twtest::IsFailureNaN(rms));
}

TEST_P(Stats, HistogramEdges) {
    struct Case {
        V x;
        int32_t bins;
        std::vector<int32_t> counts;
        V centres;
    };
    const Case cases[] = {
        // Constant data: every centre is the value and all counts go to the last bin.
        {{2, 2, 2}, 4, {0, 0, 0, 3}, {2, 2, 2, 2}},
        // The maximum indexes to `bins` and joins the last bin.
        {{0, 1, 2, 3, 4}, 2, {2, 3}, {1, 3}},
        // A NaN after the first element is ignored by the extremes scan and dropped.
        {{0, kNaNIn, 4}, 2, {1, 1}, {1, 3}},
    };
    for (const Case& c : cases) {
        const Array1D<double> x(c.x);
        Array1D<int32_t> counts;
        Array1D<double> centres;
        int32_t bins = c.bins, status = -1;
        histgran_head(x.h(), &bins, counts.h(), centres.h(), &status);
        EXPECT_EQ(status, 0);
        EXPECT_EQ(counts.vec(), c.counts);
        EXPECT_EQ(centres.vec(), c.centres);
    }
    // A leading NaN makes the extremes NaN: NaN centres, no counts, and still success.
    const Array1D<double> x{kNaNIn, 1, 2};
    Array1D<int32_t> counts;
    Array1D<double> centres;
    int32_t bins = 2, status = -1;
    histgran_head(x.h(), &bins, counts.h(), centres.h(), &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(counts.vec(), (std::vector<int32_t>{0, 0}));
    EXPECT_TRUE(std::isnan(centres[0]) && std::isnan(centres[1]));
    bins = 0;
    histgran_head(x.h(), &bins, counts.h(), centres.h(), &status);
    EXPECT_EQ(status, EmptyArrayErr);
    EXPECT_EQ(counts.size(), 0);
}

TEST_P(Stats, Mode) {
    struct Case {
        V x;
        int32_t intervals;
        V modes;
    };
    const Case cases[] = {
        {{4}, 0, {}},
        {{4}, 3, {}},
        {{1, 2, 3}, 0, {}},
        {{1, 1, 2, 2, 3}, 0, {1, 2}},
        {{3, 1, 3, 1, 2, 3}, 0, {3}},
        {{1, 2, 3, 4}, 2, {1.75, 3.25}},
        {{1, 2, 3, 4}, 4, {}},  // one value per bin
        {{5, 5, 5}, 3, {5}},    // constant data
        {{5, 5, 5}, 0, {5}},
        {{kNaNIn, kNaNIn, 1, 2}, 0, {}},  // NaN never equals NaN
        // Equality is relative to the earlier value: 1 and 1 + 2^-52 are one value.
        {{1, 1 + std::ldexp(1.0, -52), 2}, 0, {1}},
    };
    for (const Case& c : cases) {
        const Array1D<double> x(c.x);
        Array1D<double> modes{9, 9};
        EXPECT_EQ(ModeH(x.h(), c.intervals, modes.h()), 0);
        EXPECT_EQ(modes.vec(), c.modes) << "intervals " << c.intervals;
    }
    const Array1D<double> empty;
    Array1D<double> modes{9};
    EXPECT_EQ(ModeH(empty.h(), 0, modes.h()), EmptyArrayErr);
    EXPECT_EQ(modes.size(), 0);
}

TEST_P(Stats, GeneralHistogram) {
    struct Case {
        V x;
        std::vector<HistogramInterval> intervals;
        std::vector<int32_t> counts;
        HistogramOutside outside;
    };
    const Case cases[] = {
        // Overlapping intervals each count the value.
        {{0.75}, {{0, 1, 0}, {0.5, 2, 2}}, {1, 1}, {0, 0, 0}},
        // Type 7: everything is inside, NaN included.
        {{-5, kNaNIn, 5}, {{0, 1, 7}}, {3}, {0, 0, 0}},
        // Below the first interval: later intervals are not tested even if they would hold it.
        {{-1}, {{0, 1, 0}, {-2, 0, 0}}, {0, 0}, {1, 1, 0}},
        // A gap raises only the total; above the last raises the above field too.
        {{1.5, 3, kNaNIn}, {{0, 1, 0}, {2, 2.5, 0}}, {0, 0}, {3, 0, 2}},
        // Boundaries by type: [0,1) (0,1] [0,1] (0,1).
        {{0, 1}, {{0, 1, 0}, {0, 1, 1}, {0, 1, 2}, {0, 1, 3}}, {1, 1, 2, 0}, {0, 0, 0}},
        // One interval: below and above both apply to it.
        {{-1, 2}, {{0, 1, 1}}, {0}, {2, 1, 1}},
        // No intervals: empty counts and a zeroed record.
        {{1}, {}, {}, {0, 0, 0}},
    };
    for (const Case& c : cases) {
        const Array1D<double> x(c.x);
        const Array1D<HistogramInterval> intervals(c.intervals);
        Array1D<int32_t> counts;
        HistogramOutside outside{7, 7, 7};
        int32_t status = -1;
        GenHistH(x.h(), intervals.h(), counts.h(), &outside, &status);
        EXPECT_EQ(status, 0);
        EXPECT_EQ(counts.vec(), c.counts);
        EXPECT_EQ(outside.total, c.outside.total);
        EXPECT_EQ(outside.below, c.outside.below);
        EXPECT_EQ(outside.above, c.outside.above);
    }
}

TEST_P(Stats, GeneralHistogramFailures) {
    const Array1D<double> x{1}, empty;
    const Array1D<HistogramInterval> intervals{{0, 2, 0}};
    Array1D<int32_t> counts{4};
    HistogramOutside outside{7, 7, 7};
    int32_t status = 0;
    GenHistH(empty.h(), intervals.h(), counts.h(), &outside, &status);
    EXPECT_EQ(status, EmptyArrayErr);
    EXPECT_EQ(counts.size(), 0);
    EXPECT_EQ(outside.total, 0);

    TWRTFailResizeAt(1);
    GenHistH(x.h(), intervals.h(), counts.h(), &outside, &status);
    TWRTFailResizeAt(0);
    EXPECT_EQ(status, OutOfMemoryErr);

    // A negative stored count is checked before the data.
    Array1D<HistogramInterval> negative;
    const int32_t minus = -1;
    std::memcpy(*negative.h(), &minus, sizeof minus);
    GenHistH(empty.h(), negative.h(), counts.h(), &outside, &status);
    EXPECT_EQ(status, SizeMismatchErr);
}

INSTANTIATE_TEST_SUITE_P(Placements, Stats, ::testing::Values(false, true), twtest::PlacementName);

}  // namespace
