// Statuses of the level, pulse, transition and cycle exports, the zeroed results of a failure,
// and the life of the bin buffer in work cells and instance-data cells.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <functional>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/link.h"
#include "twanlys/measure.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using V = std::vector<double>;

// Two pulses of a square wave, edges between samples 3|4, 7|8, 11|12, 15|16.
V Square() {
    V x;
    for (int k = 0; k < 20; ++k) x.push_back((k / 4) % 2 == 1 ? 1.0 : 0.0);
    return x;
}

struct Args {
    V x = Square();
    double dt = 1;
    int32_t number = 1;
    MeasureReferences refs{0.9, 0.5, 0.1, 0};
    HistogramSettings hist{0, 10};
    bool nullRefs = false, nullHist = false;
    uint16_t polarity = 0xFFFF;
};

// Every f64 result of the call is filled with 7 first, so a failure must visibly zero them.
using Call = std::function<int32_t(const Args&, std::vector<double>&)>;

int32_t Levels(const Args& a, std::vector<double>& r) {
    Array1D<double> x(a.x);
    void* cell = nullptr;
    r.assign(3, 7);
    const int32_t s = StateLevels(x.h(), 0, a.dt, static_cast<int32_t>(a.hist.method), a.hist.bins, &cell, &r[0],
                                  &r[1], &r[2], a.number == 2 ? 2 : 0);
    TWRTRunCleanups(2);
    return s;
}

template <int Kind>
int32_t Record(const Args& a, std::vector<double>& r) {
    Array1D<double> x(a.x);
    void* cell = nullptr;
    const MeasureReferences* refs = a.nullRefs ? nullptr : &a.refs;
    const HistogramSettings* hist = a.nullHist ? nullptr : &a.hist;
    int32_t s = 0;
    if (Kind == 0) {
        r.assign(7, 7);
        s = PulseMeasEx_IDP(x.h(), 0, a.dt, a.polarity, 0, a.number, refs, hist, &cell, &r[0], &r[1], &r[2],
                            &r[3], &r[4], &r[5], &r[6], 0);
        MeasurementUnreserveProc(&cell);
    } else if (Kind == 1) {
        r.assign(11, 7);
        s = TransMeas(x.h(), 0, a.dt, a.polarity, a.number, refs, hist, &cell, &r[0], &r[1], &r[2], &r[3], &r[4],
                      &r[5], &r[6], &r[7], &r[8], &r[9], &r[10], 0);
    } else {
        r.assign(5, 7);
        s = CycleRMSAverage(x.h(), 0, a.dt, a.number, refs, hist, &cell, &r[0], &r[1], &r[2], &r[3], &r[4], 0);
    }
    TWRTRunCleanups(2);
    return s;
}

class Measure : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(Measure, StatusesInTheirOrder) {
    const Call levels = Levels, pulse = Record<0>, trans = Record<1>, cycle = Record<2>;
    struct Case {
        const Call* call;
        std::function<void(Args&)> change;
        int32_t status;
    };
    const V constant(10, 2.0);
    const Case cases[] = {
        {&levels, [](Args&) {}, 0},
        {&levels, [](Args& a) { a.hist.bins = 0, a.x.clear(); }, HistogramSizeErr},
        {&levels, [](Args& a) { a.x.clear(), a.dt = 0; }, MeasureEmptyWaveformErr},
        {&levels, [](Args& a) { a.dt = NAN, a.number = 2; }, MeasureDtErr},
        {&levels, [](Args& a) { a.number = 2, a.hist.method = 3; }, InvalidSelectorErr},
        {&levels, [](Args& a) { a.hist.method = 3; }, HistogramMethodErr},
        {&levels, [&](Args& a) { a.x = constant; }, LevelOrderErr},
        {&levels, [&](Args& a) { a.x = constant, a.hist.method = 2; }, LevelOrderErr},
        {&levels, [&](Args& a) { a.x = constant, a.hist.method = 1; }, 0},
        {&levels, [](Args& a) { a.x = V(100, 0.0), a.x[99] = 1; }, StateLevelWeakWarn},
        {&pulse, [](Args&) {}, 0},
        {&pulse, [](Args& a) { a.nullRefs = true, a.hist.bins = 0; }, MeasureNullRecordErr},
        {&pulse, [](Args& a) { a.nullHist = true; }, MeasureNullRecordErr},
        {&pulse, [](Args& a) { a.hist.bins = 0, a.hist.method = 3; }, HistogramSizeErr},
        {&pulse, [](Args& a) { a.hist.method = 3, a.number = 0; }, HistogramMethodErr},
        {&pulse, [](Args& a) { a.number = 0, a.x.clear(); }, MeasureEmptyErr},
        {&pulse, [](Args& a) { a.x.clear(), a.dt = 0; }, MeasureEmptyWaveformErr},
        {&pulse, [](Args& a) { a.dt = -1, a.refs.mid = 2; }, MeasureDtErr},
        {&pulse, [](Args& a) { a.refs.mid = 0.95; }, ReferenceOrderErr},
        {&pulse, [](Args& a) { a.refs = {0.5, 0.5, 0.5, 0}; }, 0},
        {&pulse, [](Args& a) { a.number = 2; }, SlewRegionTooShortErr},
        {&pulse, [&](Args& a) { a.x = constant, a.refs.units = 1; }, LevelOrderErr},
        {&pulse, [](Args& a) { a.x.assign(100, 0.0), a.x[50] = 1, a.refs = {90, 50, 10, 1}; }, SlewRegionTooShortErr},
        {&trans, [](Args&) {}, 0},
        {&trans, [](Args& a) { a.polarity = 0, a.number = 3; }, TransitionNotFoundErr},
        {&trans, [](Args& a) { a.number = 5; }, TransitionNotFoundErr},
        {&trans, [](Args& a) { a.refs.low = 0.6; }, ReferenceOrderErr},
        {&trans, [](Args& a) { a.refs = {0.5, 0.5, 0.5, 0}; }, ReferenceUnitErr},
        {&trans, [&](Args& a) { a.x = constant, a.hist.method = 1; }, LevelOrderErr},
        {&trans, [](Args& a) { a.number = -1, a.dt = 0; }, MeasureEmptyErr},
        {&cycle, [](Args&) {}, 0},
        {&cycle, [](Args& a) { a.x.erase(a.x.begin(), a.x.begin() + 3); }, HistogramEmptyErr},
        {&cycle, [](Args& a) { a.number = 2; }, SlewRegionTooShortErr},
        {&cycle, [](Args& a) { a.nullRefs = true; }, MeasureNullRecordErr},
    };
    int line = 0;
    for (const Case& c : cases) {
        ++line;
        Args a;
        c.change(a);
        std::vector<double> r;
        EXPECT_EQ((*c.call)(a, r), c.status) << "case " << line;
        for (double v : r)
            if (c.status < 0) EXPECT_EQ(v, 0.0) << "case " << line;
            else EXPECT_TRUE(std::isfinite(v) && v != 7) << "case " << line;
    }
}

TEST_P(Measure, SquareWaveResults) {
    // Edges between samples: rise at 3.5, fall at 7.5, rise at 11.5; t0 2, dt 0.5.
    Array1D<double> x(Square());
    const MeasureReferences refs{0.9, 0.5, 0.1, 0};
    const HistogramSettings hist{0, 10};
    void* cell = nullptr;
    double r[7];
    ASSERT_EQ(PulseMeas(x.h(), 2, 0.5, 0xFFFF, 1, &refs, &hist, &cell, &r[0], &r[1], &r[2], &r[3], &r[4], &r[5],
                        &r[6], 0),
              0);
    const double want[7] = {4, 2, 0.5, 2 + 5.5 * 0.5, 0.1, 0.5, 0.9};
    for (int i = 0; i < 7; ++i) EXPECT_DOUBLE_EQ(r[i], want[i]) << i;
    // The cycle: samples 3..10, that is 0 1 1 1 1 0 0 0.
    double c[5];
    void* idp = nullptr;
    ASSERT_EQ(CycleRMSAverage_IDP(x.h(), 2, 0.5, 1, &refs, &hist, &idp, &c[0], &c[1], &c[2], &c[3], &c[4], 0),
              0);
    EXPECT_DOUBLE_EQ(c[1], 4.0 / 8);
    EXPECT_DOUBLE_EQ(c[0], std::sqrt(4.0 / 8));
    // The second rise crosses 0.1 at 11.1 and 0.9 at 11.9; no shoots on a clean square wave.
    double t[11];
    ASSERT_EQ(TransMeas_IDP(x.h(), 2, 0.5, 1, 2, &refs, &hist, &idp, &t[0], &t[1], &t[2], &t[3], &t[4], &t[5], &t[6],
                            &t[7], &t[8], &t[9], &t[10], 0),
              0);
    const double edge[8] = {0.8 / 0.8 / 0.5, 0.8 * 0.5, 2 + 11.1 * 0.5, 2 + 11.9 * 0.5, 0, 0, 0, 0};
    for (int i = 0; i < 8; ++i) EXPECT_NEAR(t[i], edge[i], 1e-14) << i;
    MeasurementUnreserveProc(&idp);
    EXPECT_EQ(idp, nullptr);
    TWRTRunCleanups(2);
}

TEST_P(Measure, WorkCellKeepsOneBufferAndOneCleanup) {
    Array1D<double> x(Square());
    void* cell = nullptr;
    double h, l, a;
    const int32_t before = TWRTCleanupCount(2);
    for (const int32_t bins : {10, 3, 3, 100}) {
        ASSERT_EQ(StateLevels(x.h(), 0, 1, 0, bins, &cell, &h, &l, &a, 0), 0);
        EXPECT_DOUBLE_EQ(l, 0.5 / bins);
        EXPECT_DOUBLE_EQ(h, 1 - 0.5 / bins);
    }
    EXPECT_EQ(TWRTCleanupCount(2), before + 1);
    void* idp = nullptr;
    for (const int32_t bins : {4, 40}) ASSERT_EQ(StateLevels_IDP(x.h(), 0, 1, 2, bins, &idp, &h, &l, &a, 1), 0);
    EXPECT_EQ(TWRTCleanupCount(2), before + 1);
    EXPECT_EQ(MeasurementUnreserveProc(&idp), 0);
    EXPECT_EQ(TWRTRunCleanups(2), before + 1);
}

TEST(MeasureFetch, StatusesAndUnalignedSamples) {
    EXPECT_EQ(measurements_create(), 0);
    EXPECT_EQ(measurements_clear(), 0);
    EXPECT_EQ(measurements_destroy(), 0);
    struct Case {
        int32_t selector, n;
        double dt;
        bool nullRefs;
        HistogramSettings hist;
        MeasureReferences refs;
        int32_t status;
    };
    const MeasureReferences good{0.9, 0.5, 0.1, 0};
    const Case cases[] = {
        {0, 0, 0, true, {0, 0}, good, MeasureEmptyWaveformErr},
        {0, 20, 0, true, {0, 0}, good, MeasureDtErr},
        {0, 20, 1, true, {0, 0}, good, MeasureNullRecordErr},
        {0, 20, 1, false, {3, 0}, good, HistogramSizeErr},
        {0, 20, 1, false, {3, 10}, good, HistogramMethodErr},
        {12, 20, 1, false, {0, 10}, {0.9, 0.95, 0.1, 0}, ReferenceOrderErr},
        {12, 20, 1, false, {0, 10}, good, 0},
        {29, 20, 1, false, {0, 10}, {0.9, 0.95, 0.1, 0}, ReferenceOrderErr},
        {33, 20, 1, false, {0, 10}, good, 0},
    };
    // Samples at a 4-byte offset, as a packed host passes them.
    std::vector<double> storage(22);
    auto* x = reinterpret_cast<double*>(reinterpret_cast<unsigned char*>(storage.data()) + 4);
    const V square = Square();
    std::memcpy(x, square.data(), 20 * sizeof(double));
    for (const Case& c : cases) {
        double result[8] = {7, 7, 7, 7, 7, 7, 7, 7};
        EXPECT_EQ(measurements_fetch(nullptr, c.selector, c.nullRefs ? nullptr : &c.refs, &c.hist, 1, 0, c.dt, x,
                                     c.n, 0, result),
                  c.status)
            << c.selector;
        const int written = c.selector == 33 ? 8 : 1;
        for (int i = 0; i < 8; ++i) {
            const bool slot = i < written || (c.selector == 29 && i == 2);
            if (!slot || c.status < 0) {
                EXPECT_EQ(result[i], slot ? 0.0 : 7.0) << c.selector << " " << i;
            }
        }
        // Hysteresis 0.4; the first fall crosses 0.9 at 7.1 and 0.1 at 7.9.
        const double want = c.selector == 12 ? 0.4 : 0.8;
        EXPECT_NEAR(result[c.selector == 33 ? 1 : 0], c.status == 0 ? want : 0.0, 1e-15) << c.selector;
    }
}

INSTANTIATE_TEST_SUITE_P(Placements, Measure, ::testing::Bool(), twtest::PlacementName);

}  // namespace
