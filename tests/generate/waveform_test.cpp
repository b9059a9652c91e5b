#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>
#include <numbers>
#include <vector>

#include "twanlys/generate.h"
#include "twrt.hpp"

namespace {

using Out = twrt::Array1D<double>;

// One call of each generator with the common scalars; extra arguments as the export needs them.
struct Gen {
    const char* name;
    std::function<int32_t(Out&, int32_t, double, double, double*, int32_t*)> call;
};

const std::vector<Gen>& Generators() {
    static const std::vector<Gen> gens = {
        {"sine", [](Out& y, int32_t n, double a, double f, double* p,
                    int32_t* s) { return SineWaveCIN(y.h(), &n, &a, &f, p, s); }},
        {"square",
         [](Out& y, int32_t n, double a, double f, double* p, int32_t* s) {
             double duty = 30;
             return SquareWaveCIN(y.h(), &n, &a, &f, p, &duty, s);
         }},
        {"triangle", [](Out& y, int32_t n, double a, double f, double* p,
                        int32_t* s) { return TriangleWaveCIN(y.h(), &n, &a, &f, p, s); }},
        {"sawtooth", [](Out& y, int32_t n, double a, double f, double* p,
                        int32_t* s) { return SawtoothWaveCIN(y.h(), &n, &a, &f, p, s); }},
        {"arbitrary",
         [](Out& y, int32_t n, double a, double f, double* p, int32_t* s) {
             const Out table{0.0, 1.0, 0.5, -0.25, -1.0};
             int32_t interpolation = 1;
             return ArbitraryWaveCIN(y.h(), &n, &a, &f, p, table.h(), &interpolation, s);
         }},
        {"chirp",
         [](Out& y, int32_t n, double a, double f, double*, int32_t* s) {
             double end = 0.4;
             return ChirpCIN(y.h(), &n, &a, &f, &end, s);
         }},
    };
    return gens;
}

TEST(Waveforms, EmptyLengthAndFailedResizeShrinkTheOutput) {
    for (const Gen& g : Generators()) {
        SCOPED_TRACE(g.name);
        for (int32_t n : {0, -3}) {
            Out y{1, 2, 3};
            double phase = 12.5;
            int32_t status = 0;
            EXPECT_EQ(g.call(y, n, 1.0, 0.1, &phase, &status), 0);
            EXPECT_EQ(status, EmptyArrayErr);
            EXPECT_EQ(y.size(), 0);
            EXPECT_EQ(phase, 12.5);
        }
        Out y{1, 2, 3};
        double phase = 12.5;
        int32_t status = 0;
        TWRTFailResizeAt(1);
        EXPECT_EQ(g.call(y, 8, 1.0, 0.1, &phase, &status), TWRTResizeFailed);
        TWRTFailResizeAt(0);
        EXPECT_EQ(status, OutOfMemoryErr);
        EXPECT_EQ(y.size(), 0);
        EXPECT_EQ(phase, 12.5);
    }
}

// Splitting a block and handing the phase on reproduces the long block, for both placements of
// the host's blocks.
TEST(Waveforms, SplitBlocksContinueTheLongBlock) {
    for (bool aligned : {false, true}) {
        const twrt::Placement place(aligned);
        for (const Gen& g : Generators()) {
            if (std::string(g.name) == "chirp") continue;
            SCOPED_TRACE(g.name);
            const double f = 0.0123, a = 2.5;
            Out whole, part;
            double p1 = -37.0, p2 = -37.0;
            int32_t s = -1;
            g.call(whole, 1000, a, f, &p1, &s);
            ASSERT_EQ(s, 0);
            std::vector<double> pieces;
            for (int32_t n : {1, 333, 2, 664}) {
                g.call(part, n, a, f, &p2, &s);
                ASSERT_EQ(s, 0);
                for (double v : part.vec()) pieces.push_back(v);
            }
            const std::vector<double> ref = whole.vec();
            ASSERT_EQ(pieces.size(), ref.size());
            for (size_t k = 0; k < ref.size(); ++k) ASSERT_NEAR(pieces[k], ref[k], 1e-9) << k;
            EXPECT_NEAR(p1, p2, 1e-9);
            EXPECT_GE(p1, 0.0);
            EXPECT_LT(p1, 360.0);
        }
    }
}

TEST(Waveforms, SquareDutyIsClamped) {
    struct Case {
        double duty;
        double expectFirst;  // every sample equals this when the duty covers all or nothing
    } cases[] = {{0, -1.5}, {-20, -1.5}, {100, 1.5}, {150, 1.5}};
    for (const Case& c : cases) {
        Out y;
        int32_t n = 50, s = -1;
        double a = 1.5, f = 0.07, p = 0, duty = c.duty;
        SquareWaveCIN(y.h(), &n, &a, &f, &p, &duty, &s);
        ASSERT_EQ(s, 0);
        for (double v : y.vec()) ASSERT_EQ(v, c.expectFirst) << "duty " << c.duty;
    }
}

TEST(Waveforms, SawtoothJumpsAt180Degrees) {
    Out y;
    int32_t n = 3, s = -1;
    double a = 2, f = 0.25, p = 90;  // phases 90, 180, 270
    SawtoothWaveCIN(y.h(), &n, &a, &f, &p, &s);
    ASSERT_EQ(s, 0);
    EXPECT_EQ(y[0], 1.0);
    EXPECT_EQ(y[1], -2.0);
    EXPECT_EQ(y[2], -1.0);
    EXPECT_EQ(p, 0.0);
}

TEST(Waveforms, SineOfOneSampleStillAdvancesThePhase) {
    Out y;
    int32_t n = 1, s = -1;
    double a = 3, f = 0.1, p = -30;
    SineWaveCIN(y.h(), &n, &a, &f, &p, &s);
    ASSERT_EQ(s, 0);
    ASSERT_EQ(y.size(), 1);
    EXPECT_DOUBLE_EQ(y[0], -1.5);
    EXPECT_DOUBLE_EQ(p, 6.0);  // -30 + 36
}

TEST(Waveforms, SineStaysWithinItsAmplitude) {
    Out y;
    int32_t n = 200000, s = -1;
    double a = -1.25, f = 0.25, p = 0;  // peaks land exactly on the samples
    SineWaveCIN(y.h(), &n, &a, &f, &p, &s);
    ASSERT_EQ(s, 0);
    for (double v : y.vec()) ASSERT_LE(std::fabs(v), 1.25);
}

TEST(Waveforms, ArbitraryWaveCornerCases) {
    // An empty table gives zeros and phase 0 without an error.
    {
        Out y, table;
        int32_t n = 5, s = -1, interpolation = 1;
        double a = 1, f = 0.1, p = 45;
        ArbitraryWaveCIN(y.h(), &n, &a, &f, &p, table.h(), &interpolation, &s);
        EXPECT_EQ(s, 0);
        EXPECT_EQ(y.vec(), std::vector<double>(5, 0.0));
        EXPECT_EQ(p, 0.0);
    }
    // A phase or frequency that is not finite is refused and leaves the phase alone.
    const double bad[] = {std::numeric_limits<double>::infinity(), std::nan("")};
    for (double v : bad) {
        for (int which = 0; which < 2; ++which) {
            Out y{1, 2}, table{1, 2, 3};
            int32_t n = 5, s = -1, interpolation = 0;
            double a = 1, f = which ? v : 0.1, p = which ? 10 : v;
            ArbitraryWaveCIN(y.h(), &n, &a, &f, &p, table.h(), &interpolation, &s);
            EXPECT_EQ(s, NanInfErr);
            EXPECT_EQ(y.size(), 0);
            const double entry = which ? 10 : v;
            EXPECT_TRUE(p == entry || (std::isnan(p) && std::isnan(entry)));
        }
    }
    // Without interpolation the sample at or below the position; a negative phase wraps.
    {
        Out y, table{10, 20, 30, 40};
        int32_t n = 6, s = -1, interpolation = 0;
        double a = 1, f = 0.3, p = -90;  // positions -1, 0.2, 1.4, 2.6, 3.8, 5.0
        ArbitraryWaveCIN(y.h(), &n, &a, &f, &p, table.h(), &interpolation, &s);
        EXPECT_EQ(s, 0);
        EXPECT_EQ(y.vec(), (std::vector<double>{40, 10, 20, 30, 40, 20}));
        EXPECT_NEAR(p, 180 + 0.2 * 90, 1e-12);  // position 6.2 of 4
    }
}

TEST(Waveforms, ChirpStartsAtItsStartFrequency) {
    Out y;
    int32_t n = 4, s = -1;
    double a = 2, start = 0.25, end = 0.25;  // a constant frequency of a quarter cycle
    ChirpCIN(y.h(), &n, &a, &start, &end, &s);
    ASSERT_EQ(s, 0);
    const double expected[] = {0, 2, 0, -2};
    for (int k = 0; k < 4; ++k) EXPECT_NEAR(y[k], expected[k], 1e-15);
}

}  // namespace
