// Statuses of the peak detectors, the failure state of a stream, and the 64 bytes of its record.
#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/measure.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;

class Peaks : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(Peaks, StreamStatusesAndTheFailedState) {
    struct Case {
        int32_t n, width;
        uint32_t flags;
        bool work, primed;
        int32_t status;
    };
    const Case cases[] = {
        {30, 5, 5, true, false, 0},
        {30, 2, 5, true, false, InvalidSelectorErr},
        {2, 1073741825, 5, true, false, InvalidSelectorErr},
        {4, 5, 5, true, false, WidthRangeErr},
        {30, 5, 1, false, false, NoPeakFoundErr},
        {30, 5, 0, true, false, StateSizeErr},
        {30, 7, 0, true, true, StateSizeErr},  // the stream was started with width 5
        {30, 5, 4, true, true, 0},
    };
    for (const Case& c : cases) {
        std::vector<double> v(static_cast<size_t>(c.n));
        for (size_t i = 0; i < v.size(); ++i) v[i] = (i % 10 == 5) ? 1.0 : 0.0;
        Array1D<double> x(v), loc({9.0}), amp({9.0}), d2({9.0});
        Array1D<double> work(3);
        PeakDetectState state{};
        int32_t status = 1;
        if (c.primed) {
            PeakDetectSettings first{x.h(), 0.3, 5, 0, loc.h(), amp.h(), d2.h(), 0, 1};
            ASSERT_EQ(PeakD(&first, &state, work.h(), &status), 0);
        }
        PeakDetectSettings set{x.h(), 0.3, c.width, 0, loc.h(), amp.h(), d2.h(), -1, c.flags};
        EXPECT_EQ(PeakD2010(&set, &state, c.work ? work.h() : nullptr, &status, 1), c.status) << c.width;
        EXPECT_EQ(status, c.status);
        const bool cleared = c.status < 0 || (c.flags & 4) != 0;
        if (c.status < 0) {
            EXPECT_EQ(set.count, 0);
            EXPECT_EQ(loc.size() + amp.size() + d2.size(), 0);
        } else {
            EXPECT_EQ(set.count, loc.size());
            EXPECT_GE(set.count, 2);
        }
        PeakDetectState zero{};
        EXPECT_EQ(std::memcmp(&state, &zero, sizeof state) == 0, cleared);
        if (cleared && c.work) {
            EXPECT_EQ(work.size(), 0);
        }
    }
}

TEST_P(Peaks, StateRecordIsSixtyFourBytesIntoTheWorkBlock) {
    std::vector<double> v(40);
    for (size_t i = 0; i < v.size(); ++i) v[i] = static_cast<double>(i % 7);
    Array1D<double> x(v), raw(std::vector<double>(12, 1.0)), loc, amp, d2, work;
    unsigned char record[80];
    std::memset(record, 0xAB, sizeof record);
    auto* state = reinterpret_cast<PeakDetectState*>(record);
    PeakDetectSettings set{x.h(), 0, 6, 0, loc.h(), amp.h(), d2.h(), 0, 1};
    int32_t status = 1;
    ASSERT_EQ(PeakD2014(raw.h(), &set, state, work.h(), &status, 0), 0);
    for (size_t i = 64; i < sizeof record; ++i) ASSERT_EQ(record[i], 0xAB) << i;
    EXPECT_EQ(work.size(), 5 * 6 + 3);
    EXPECT_EQ(state->width, 6);
    EXPECT_EQ(state->tailCount, 6);
    EXPECT_EQ(state->windowsDone, 40 - 6);
    auto* base = reinterpret_cast<double*>(work.data());
    EXPECT_EQ(state->projection, base);
    EXPECT_EQ(state->tail, base + 4 * 6);
    EXPECT_EQ(state->lastCoefficients, base + 5 * 6);
    double tail[6];
    std::memcpy(tail, work.data() + 4 * 6 * sizeof(double), sizeof tail);
    for (int i = 0; i < 6; ++i) EXPECT_EQ(tail[i], v[34 + static_cast<size_t>(i)]);
    // Mode 2 reads the raw block: 12 ones are a fresh stream of flat data without peaks.
    set.flags = 5;
    ASSERT_EQ(PeakD2014(raw.h(), &set, state, work.h(), &status, 2), 0);
    EXPECT_EQ(set.count, 0);
}

TEST_P(Peaks, ThresholdRunStatuses) {
    struct Case {
        int32_t n, width, status;
    };
    for (const Case c : {Case{0, 1, EmptyArrayErr}, Case{5, 0, WidthRangeErr}, Case{5, 5, WidthRangeErr},
                         Case{5, 4, 0}}) {
        Array1D<double> x(std::vector<double>(static_cast<size_t>(c.n), 1.0));
        Array1D<int32_t> loc({7});
        double threshold = 1;
        int32_t width = c.width, count = -1, status = 1;
        EXPECT_EQ(PeakDetector(x.h(), &threshold, &width, loc.h(), &count, &status), c.status);
        EXPECT_EQ(status, c.status);
        EXPECT_EQ(count, c.status == 0 ? 1 : 0);
        EXPECT_EQ(loc.size(), count);
    }
}

INSTANTIATE_TEST_SUITE_P(Placements, Peaks, ::testing::Bool(), twtest::PlacementName);

}  // namespace
