#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <limits>
#include <vector>

#include "twanlys/generate.h"
#include "twrt.hpp"

namespace {

using Out = twrt::Array1D<double>;
using V = std::vector<double>;
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr int32_t kMax = std::numeric_limits<int32_t>::max();

// The status-by-pointer patterns with their scalars; the status is what the pointer received.
int32_t SquareCall(Out& y, int32_t n, double duty, double cycles, double a = 1) {
    int32_t s = 1;
    Square(y.h(), &n, &a, &duty, &cycles, &s);
    return s;
}
int32_t PulseCall(Out& y, int32_t n, int32_t delay, int32_t width, double a = 1) {
    int32_t s = 1;
    PulsePtrn(y.h(), &n, &a, &delay, &width, &s);
    return s;
}
int32_t ImpulseCall(Out& y, int32_t n, int32_t delay, double a = 1) {
    int32_t s = 1;
    ImpulsePtrn(y.h(), &n, &a, &delay, &s);
    return s;
}
int32_t SincCall(Out& y, int32_t n, double dt) {
    double a = 1, delay = 0;
    int32_t s = 1;
    SincWave(y.h(), &n, &a, &delay, &dt, &s);
    return s;
}
int32_t RampCall(Out& y, int32_t n, double start, double end) {
    int32_t s = 1;
    RampPtrn(y.h(), &n, &start, &end, &s);
    return s;
}

struct Row {
    const char* what;
    std::function<int32_t(Out&)> call;
    int32_t expected;
};

// Every refused call in the order the tests run: the first failing test decides, and the output
// (for the pulses, the caller's time array) is emptied.
TEST(Patterns, FailuresInTheirOrder) {
    const Row rows[] = {
        {"sine empty",
         [](Out& y) {
             int32_t n = 0, s = 1;
             double a = 1, p = 0, c = 1;
             SinePtrn(y.h(), &n, &a, &p, &c, &s);
             return s;
         },
         EmptyArrayErr},
        {"square length before duty", [](Out& y) { return SquareCall(y, 0, 0, 1); }, EmptyArrayErr},
        {"square duty 0 before cycles", [](Out& y) { return SquareCall(y, 10, 0, 0); }, PeriodNotPositiveErr},
        {"square duty NaN", [](Out& y) { return SquareCall(y, 10, kNaN, 2); }, PeriodNotPositiveErr},
        {"square cycles 0", [](Out& y) { return SquareCall(y, 10, 50, 0); }, DutyRangeErr},
        {"square cycles above length >> 1", [](Out& y) { return SquareCall(y, 9, 50, 4.5); }, DutyRangeErr},
        {"square length 1", [](Out& y) { return SquareCall(y, 1, 50, 0.5); }, DutyRangeErr},
        {"pulse empty", [](Out& y) { return PulseCall(y, 0, -1, 0); }, EmptyArrayErr},
        {"pulse delay negative", [](Out& y) { return PulseCall(y, 10, -1, 2); }, DelayWidthRangeErr},
        {"pulse width negative", [](Out& y) { return PulseCall(y, 10, 2, -1); }, DelayWidthRangeErr},
        {"pulse sum beyond", [](Out& y) { return PulseCall(y, 10, 5, 6); }, DelayWidthRangeErr},
        {"pulse huge delay and width", [](Out& y) { return PulseCall(y, 10, kMax, kMax); },
         DelayWidthRangeErr},
        {"impulse delay negative", [](Out& y) { return ImpulseCall(y, 4, -1); }, IndexRangeErr},
        {"impulse delay at length", [](Out& y) { return ImpulseCall(y, 4, 4); }, IndexRangeErr},
        {"sinc length before dt", [](Out& y) { return SincCall(y, 0, 0); }, EmptyArrayErr},
        {"sinc dt 0", [](Out& y) { return SincCall(y, 5, 0); }, SampleIntervalErr},
        {"sinc dt NaN", [](Out& y) { return SincCall(y, 5, kNaN); }, SampleIntervalErr},
        {"ramp forwards length 0", [](Out& y) { return RampCall(y, 0, 1, 2); }, TooFewSamples2Err},
        {"ramp one sample of two values", [](Out& y) { return RampCall(y, 1, 1, 2); }, TooFewSamples2Err},
        {"ramp scale first", [](Out& y) { return RampPtrn85(y.h(), 0, -1, 2, 1, 2); }, InvalidSelectorErr},
        {"ramp excluded end, empty", [](Out& y) { return RampPtrn85(y.h(), 0, -1, 2, 1, 1); },
         SamplesNotPositiveErr},
        {"ramp other excludeEnd, empty", [](Out& y) { return RampPtrn85(y.h(), 0, 1, 2, 2, 1); },
         EmptyArrayErr},
        {"ramp80 one sample", [](Out& y) { return RampPtrn80(y.h(), 1, 1, 2, 0); }, TooFewSamples2Err},
        {"ramp log start 0", [](Out& y) { return RampPtrn85(y.h(), 5, 0, 2, 0, 1); }, BadDataRangeErr},
        {"ramp log end NaN", [](Out& y) { return RampPtrn85(y.h(), 5, 1, kNaN, 1, 1); }, BadDataRangeErr},
        {"triangle width before skew", [](Out& y) { return AperiodTriangleH(y.h(), 0, 1, 0, 0, 0, 2); },
         BadDataRangeErr},
        {"triangle skew before length", [](Out& y) { return AperiodTriangleH(y.h(), 0, 1, 0, 0, 1, 1.5); },
         ProbabilityRangeErr},
        {"triangle skew NaN", [](Out& y) { return AperiodTriangleH(y.h(), 5, 1, 0, 1, 1, kNaN); },
         ProbabilityRangeErr},
        {"triangle length before dt", [](Out& y) { return AperiodTriangleH(y.h(), 0, 1, 0, 0, 1, 0.5); },
         EmptyArrayErr},
        {"triangle dt", [](Out& y) { return AperiodTriangleH(y.h(), 5, 1, 0, -1, 1, 0.5); },
         SampleIntervalErr},
        {"gauss pulse fc first", [](Out& y) { return GaussPulseH(y.h(), 0, 1, 0, 0, 0, 1, 1); },
         BadDataRangeErr},
        {"gauss pulse bandwidth", [](Out& y) { return GaussPulseH(y.h(), 0, 1, 0, 0, 1, -1, 1); },
         BadDataRangeErr},
        {"gauss pulse attenuation", [](Out& y) { return GaussPulseH(y.h(), 0, 1, 0, 0, 1, 1, 0); },
         BadDataRangeErr},
        {"gauss pulse length", [](Out& y) { return GaussPulseH(y.h(), 0, 1, 0, 0, 1, 1, 1); }, EmptyArrayErr},
        {"gauss pulse dt", [](Out& y) { return GaussPulseH(y.h(), 4, 1, 0, 0, 1, 1, 1); }, SampleIntervalErr},
        {"monopulse fc first", [](Out& y) { return GaussMonopulseH(y.h(), 0, 0, 0, 0, 1); }, BadDataRangeErr},
        {"monopulse dt", [](Out& y) { return GaussMonopulseH(y.h(), 3, kNaN, 0, 1, 1); }, SampleIntervalErr},
        {"periodic sinc order first", [](Out& y) { return PeriodicSincH(y.h(), 0, 1, 0, 0, 0); },
         BadDataRangeErr},
        {"periodic sinc length", [](Out& y) { return PeriodicSincH(y.h(), -2, 1, 3, 1, 0); }, EmptyArrayErr},
        {"periodic sinc dt", [](Out& y) { return PeriodicSincH(y.h(), 3, 1, 3, 0, 0); }, SampleIntervalErr},
    };
    for (const Row& r : rows) {
        SCOPED_TRACE(r.what);
        Out y;
        EXPECT_EQ(r.call(y), r.expected);
        EXPECT_EQ(y.size(), 0);
    }
    // The pulses' shape tests hold for a time array too, and empty it; dt is not looked at there.
    Out times{0.5, 1.0};
    EXPECT_EQ(AperiodTriangleH(times.h(), 5, 1, 0, 1, 0, 0.5), BadDataRangeErr);
    EXPECT_EQ(times.size(), 0);
    Out times2{0.5, 1.0};
    EXPECT_EQ(PeriodicSincH(times2.h(), 0, 1, 1, -1, 0), 0);
    EXPECT_EQ(times2.vec(), (V{1, 1}));
    // A failed resize.
    for (int i = 0; i < 3; ++i) {
        Out y = i < 2 ? Out{1, 2} : Out{};  // a pulse resizes only an empty array
        int32_t s = 0;
        TWRTFailResizeAt(1);
        int32_t n = 10;
        double a = 1, duty = 50, cycles = 2;
        if (i == 0) {
            EXPECT_EQ(Square(y.h(), &n, &a, &duty, &cycles, &s), TWRTResizeFailed);
        }
        if (i == 1) s = RampPtrn85(y.h(), 4, 1, 2, 0, 0);
        if (i == 2) s = GaussMonopulseH(y.h(), 4, 1, 0, 1, 1);
        TWRTFailResizeAt(0);
        EXPECT_EQ(s, OutOfMemoryErr);
        EXPECT_EQ(y.size(), 0);
    }
}

TEST(Patterns, UnipolarSquarePulseAndImpulse) {
    struct Case {
        int32_t n;
        double duty, cycles;
        V expected;
    } cases[] = {
        {10, 40, 2, {3, 3, 0, 0, 0, 3, 3, 0, 0, 0}},  // P 5, H 2
        {7, 50, 2, {3, 3, 0, 0, 3, 3, 0}},            // P trunc(3.5 + 0.5)
        {6, 100, 3, V(6, 3)},
        {6, 150, 1, V(6, 3)},      // H beyond P: not an error
        {6, 1, 3, V(6, 0)},        // H rounds to 0
        {8, 30, 1e-300, V(8, 3)},  // P and H far beyond the block
    };
    for (const Case& c : cases) {
        Out y;
        ASSERT_EQ(SquareCall(y, c.n, c.duty, c.cycles, 3), 0) << c.duty;
        EXPECT_EQ(y.vec(), c.expected) << c.duty << " " << c.cycles;
    }
    Out y;
    ASSERT_EQ(PulseCall(y, 6, 2, 3, -2), 0);
    EXPECT_EQ(y.vec(), (V{0, 0, -2, -2, -2, 0}));
    ASSERT_EQ(PulseCall(y, 6, 6, 0, -2), 0);
    EXPECT_EQ(y.vec(), V(6, 0));
    ASSERT_EQ(ImpulseCall(y, 4, 3, 5), 0);
    EXPECT_EQ(y.vec(), (V{0, 0, 0, 5}));
    ASSERT_EQ(RampPtrn85(y.h(), 1, 2.5, 2.5, 0, 1), 0);
    EXPECT_EQ(y.vec(), V{2.5});
}

// The sine pattern is the sine wave at cycles / length, and leaves the caller's phase alone.
TEST(Patterns, SinePatternIsTheWaveOnAPhaseCopy) {
    Out pattern, wave;
    int32_t n = 37, s = -1;
    double a = 1.5, phase = -40, cycles = 2.25, f = cycles / n, wavePhase = phase;
    SinePtrn(pattern.h(), &n, &a, &phase, &cycles, &s);
    ASSERT_EQ(s, 0);
    SineWaveCIN(wave.h(), &n, &a, &f, &wavePhase, &s);
    ASSERT_EQ(s, 0);
    EXPECT_EQ(pattern.vec(), wave.vec());
    EXPECT_EQ(phase, -40);
}

// A refused shuffle draws nothing and empties both arrays.
TEST(Patterns, RefusedShuffleDrawsNothing) {
    RandomState st{4, 5, 6};
    Out empty;
    twrt::Array1D<int32_t> perm{1, 2, 3};
    EXPECT_EQ(RiffleArrayDBL2012_head(empty.h(), perm.h(), 3, &st, 1), EmptyArrayErr);
    EXPECT_EQ(perm.size(), 0);
    twrt::Array1D<int32_t> perm2{1, 2, 3};
    EXPECT_EQ(RiffleIntNum_head(perm2.h(), 0, 3, &st), EmptyArrayErr);
    EXPECT_EQ(perm2.size(), 0);
    EXPECT_EQ(st.s1, 4);
    EXPECT_EQ(st.s2, 5);
    EXPECT_EQ(st.s3, 6);
    twrt::Array1D<int32_t> data{7, 8}, perm3;
    TWRTFailResizeAt(1);
    EXPECT_EQ(RiffleArrayInt_head(data.h(), perm3.h(), 3, &st), OutOfMemoryErr);
    TWRTFailResizeAt(0);
    EXPECT_EQ(data.size(), 0);
    EXPECT_EQ(st.s1, 4);
}

}  // namespace
