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

// Status-by-pointer calls with the scalars a row varies; gResult keeps the export's own result.
int32_t gResult = 0;
GaussSpare gSpare{};
int32_t NoiseP(int32_t (*fn)(void**, int32_t*, double*, int32_t*, int32_t*, RandomState*), Out& y, int32_t n,
               RandomState* st) {
    double a = 1;
    int32_t seed = 5, s = 1;
    gResult = fn(y.h(), &n, &a, &seed, &s, st);
    return s;
}
int32_t GaussP(Out& y, int32_t n, RandomState* st, int32_t seed = 5) {
    double sd = 1;
    int32_t s = 1;
    gSpare = {1, 0.25};
    gResult = Gauss(y.h(), &n, &sd, &seed, &s, st, &gSpare);
    return s;
}
int32_t PeriodP(Out& y, int32_t n, RandomState* st) {
    double a = 1;
    int32_t seed = 5, s = 1;
    gResult = PeriodNoise(&n, &a, &seed, y.h(), &s, st);
    return s;
}
int32_t SquareP(Out& y, int32_t n, double duty, double cycles, double a = 1) {
    int32_t s = 1;
    gResult = Square(y.h(), &n, &a, &duty, &cycles, &s);
    return s;
}
int32_t PulseP(Out& y, int32_t n, int32_t delay, int32_t width, double a = 1) {
    int32_t s = 1;
    gResult = PulsePtrn(y.h(), &n, &a, &delay, &width, &s);
    return s;
}
int32_t ImpulseP(Out& y, int32_t n, int32_t delay, double a = 1) {
    int32_t s = 1;
    gResult = ImpulsePtrn(y.h(), &n, &a, &delay, &s);
    return s;
}
int32_t SincP(Out& y, int32_t n, double dt) {
    double a = 1, delay = 0;
    int32_t s = 1;
    gResult = SincWave(y.h(), &n, &a, &delay, &dt, &s);
    return s;
}
int32_t SineP(Out& y, int32_t n) {
    double a = 1, phase = 0, cycles = 1;
    int32_t s = 1;
    gResult = SinePtrn(y.h(), &n, &a, &phase, &cycles, &s);
    return s;
}
int32_t RampP(Out& y, int32_t n, double start, double end) {
    int32_t s = 1;
    gResult = RampPtrn(y.h(), &n, &start, &end, &s);
    return s;
}
int32_t BinomialH(Out& y, int32_t n, int32_t trials, double p, RandomState* st) {
    twrt::Array1D<uint32_t> u{1, 2};
    BinomialCache cache{};
    const int32_t s = BinomialNoiseH(u.h(), n, trials, p, 5, st, &cache);
    if (u.size() == 0) y = Out{};  // report the shrink through y
    return s;
}

// The pulses sample a grid only into an empty array.
void** Grid(Out& y) {
    y = Out{};
    return y.h();
}

struct Row {
    const char* what;
    std::function<int32_t(Out&, RandomState*)> call;
    int32_t expected;
};

// Every refusal in the order the tests run: the first failing test decides, the output (for the
// pulses the caller's time array) is emptied and the caller's record is not drawn from.
TEST(NoiseAndPatterns, FailuresInTheirOrder) {
    using S = RandomState*;
    const Row rows[] = {
        {"white empty", [](Out& y, S st) { return NoiseP(white, y, 0, st); }, EmptyArrayErr},
        {"Gauss empty, spare kept", [](Out& y, S st) { return GaussP(y, -3, st) + (gSpare.haveSpare - 1); },
         EmptyArrayErr},
        {"PeriodNoise empty", [](Out& y, S st) { return PeriodP(y, 0, st); }, EmptyArrayErr},
        {"gamma order first", [](Out& y, S st) { return GammaNoiseH(y.h(), 0, 0, 5, st); },
         InvalidSelectorErr},
        {"gamma empty", [](Out& y, S st) { return GammaNoiseH(y.h(), 0, 1, 5, st); }, EmptyArrayErr},
        {"Poisson mean first", [](Out& y, S st) { return PoissonNoiseH(y.h(), 0, -1e-300, 5, st); },
         InvalidSelectorErr},
        {"Poisson NaN mean", [](Out& y, S st) { return PoissonNoiseH(y.h(), 9, kNaN, 5, st); },
         InvalidSelectorErr},
        {"Poisson empty", [](Out& y, S st) { return PoissonNoiseH(y.h(), -1, 0, 5, st); }, EmptyArrayErr},
        {"binomial trials first", [](Out& y, S st) { return BinomialH(y, 0, -1, 0.5, st); },
         InvalidSelectorErr},
        {"binomial p above 1", [](Out& y, S st) { return BinomialH(y, 0, 10, 1.0000001, st); },
         InvalidSelectorErr},
        {"binomial p below 0", [](Out& y, S st) { return BinomialH(y, 9, 10, -0.1, st); },
         InvalidSelectorErr},
        {"binomial p NaN", [](Out& y, S st) { return BinomialH(y, 9, 10, kNaN, st); }, InvalidSelectorErr},
        {"binomial empty", [](Out& y, S st) { return BinomialH(y, 0, 0, 1.0, st); }, EmptyArrayErr},
        {"sine empty", [](Out& y, S) { return SineP(y, 0); }, EmptyArrayErr},
        {"square length first", [](Out& y, S) { return SquareP(y, 0, 0, 1); }, EmptyArrayErr},
        {"square duty before cycles", [](Out& y, S) { return SquareP(y, 10, 0, 0); }, PeriodNotPositiveErr},
        {"square duty NaN", [](Out& y, S) { return SquareP(y, 10, kNaN, 2); }, PeriodNotPositiveErr},
        {"square cycles 0", [](Out& y, S) { return SquareP(y, 10, 50, 0); }, DutyRangeErr},
        {"square cycles above length >> 1", [](Out& y, S) { return SquareP(y, 9, 50, 4.5); }, DutyRangeErr},
        {"pulse length first", [](Out& y, S) { return PulseP(y, 0, -1, 0); }, EmptyArrayErr},
        {"pulse delay negative", [](Out& y, S) { return PulseP(y, 10, -1, 2); }, DelayWidthRangeErr},
        {"pulse width negative", [](Out& y, S) { return PulseP(y, 10, 2, -1); }, DelayWidthRangeErr},
        {"pulse sum beyond", [](Out& y, S) { return PulseP(y, 10, 5, 6); }, DelayWidthRangeErr},
        {"pulse huge delay and width", [](Out& y, S) { return PulseP(y, 10, kMax, kMax); },
         DelayWidthRangeErr},
        {"impulse delay negative", [](Out& y, S) { return ImpulseP(y, 4, -1); }, IndexRangeErr},
        {"impulse delay at length", [](Out& y, S) { return ImpulseP(y, 4, 4); }, IndexRangeErr},
        {"sinc length first", [](Out& y, S) { return SincP(y, 0, 0); }, EmptyArrayErr},
        {"sinc dt NaN", [](Out& y, S) { return SincP(y, 5, kNaN); }, SampleIntervalErr},
        {"ramp forwards length 0", [](Out& y, S) { return RampP(y, 0, 1, 2); }, TooFewSamples2Err},
        {"ramp one sample, two values", [](Out& y, S) { return RampP(y, 1, 1, 2); }, TooFewSamples2Err},
        {"ramp scale first", [](Out& y, S) { return RampPtrn85(y.h(), 0, -1, 2, 1, 2); }, InvalidSelectorErr},
        {"ramp excluded end, empty", [](Out& y, S) { return RampPtrn85(y.h(), 0, -1, 2, 1, 1); },
         SamplesNotPositiveErr},
        {"ramp other excludeEnd", [](Out& y, S) { return RampPtrn85(y.h(), 0, 1, 2, 2, 1); }, EmptyArrayErr},
        {"ramp log start 0", [](Out& y, S) { return RampPtrn85(y.h(), 5, 0, 2, 0, 1); }, BadDataRangeErr},
        {"ramp log end NaN", [](Out& y, S) { return RampPtrn85(y.h(), 5, 1, kNaN, 1, 1); }, BadDataRangeErr},
        {"triangle width first", [](Out& y, S) { return AperiodTriangleH(y.h(), 0, 1, 0, 0, 0, 2); },
         BadDataRangeErr},
        {"triangle skew before length", [](Out& y, S) { return AperiodTriangleH(y.h(), 0, 1, 0, 0, 1, 1.5); },
         ProbabilityRangeErr},
        {"triangle length before dt", [](Out& y, S) { return AperiodTriangleH(Grid(y), 0, 1, 0, 0, 1, 0.5); },
         EmptyArrayErr},
        {"triangle dt", [](Out& y, S) { return AperiodTriangleH(Grid(y), 5, 1, 0, -1, 1, 0.5); },
         SampleIntervalErr},
        {"gauss pulse fc first", [](Out& y, S) { return GaussPulseH(y.h(), 0, 1, 0, 0, 0, 1, 1); },
         BadDataRangeErr},
        {"gauss pulse bandwidth", [](Out& y, S) { return GaussPulseH(y.h(), 0, 1, 0, 0, 1, -1, 1); },
         BadDataRangeErr},
        {"gauss pulse attenuation", [](Out& y, S) { return GaussPulseH(y.h(), 0, 1, 0, 0, 1, 1, 0); },
         BadDataRangeErr},
        {"gauss pulse dt", [](Out& y, S) { return GaussPulseH(Grid(y), 4, 1, 0, 0, 1, 1, 1); },
         SampleIntervalErr},
        {"monopulse fc first", [](Out& y, S) { return GaussMonopulseH(y.h(), 0, 0, 0, 0, 1); },
         BadDataRangeErr},
        {"monopulse dt", [](Out& y, S) { return GaussMonopulseH(Grid(y), 3, kNaN, 0, 1, 1); },
         SampleIntervalErr},
        {"periodic sinc order first", [](Out& y, S) { return PeriodicSincH(y.h(), 0, 1, 0, 0, 0); },
         BadDataRangeErr},
        {"periodic sinc length", [](Out& y, S) { return PeriodicSincH(Grid(y), -2, 1, 3, 1, 0); },
         EmptyArrayErr},
        {"shuffle empty data",
         [](Out& y, S st) { return RiffleArrayDBL2012_head(Out{}.h(), y.h(), 3, st, 1); }, EmptyArrayErr},
        {"shuffle of no numbers", [](Out& y, S st) { return RiffleIntNum_head(y.h(), 0, 3, st); },
         EmptyArrayErr},
    };
    for (const Row& r : rows) {
        SCOPED_TRACE(r.what);
        Out y{1, 2, 3};
        RandomState st{7, 8, 9};
        gResult = 0;
        EXPECT_EQ(r.call(y, &st), r.expected);
        EXPECT_EQ(gResult, 0);
        EXPECT_EQ(y.size(), 0);
        EXPECT_EQ(st.s1 * 10000 + st.s2 * 100 + st.s3, 70809);
    }
    // The shape tests hold for a time array too; dt is not looked at there.
    Out times{0.5, 1.0}, times2{0.5, 1.0};
    EXPECT_EQ(AperiodTriangleH(times.h(), 5, 1, 0, 1, 0, 0.5), BadDataRangeErr);
    EXPECT_EQ(times.size(), 0);
    EXPECT_EQ(PeriodicSincH(times2.h(), 0, 1, 1, -1, 0), 0);
    EXPECT_EQ(times2.vec(), (V{1, 1}));
    // A failed resize: OutOfMemoryErr, the host's own code as the result of the pointer frames.
    const std::function<int32_t(Out&, RandomState*)> resized[] = {
        [](Out& y, S st) { return NoiseP(white, y, 4, st); },
        [](Out& y, S st) { return PeriodP(y, 4, st); },
        [](Out& y, S) { return SquareP(y, 10, 50, 2); },
        [](Out& y, S st) { return GammaNoiseH(y.h(), 4, 7, 1, st); },
        [](Out&, S) { return GaussMonopulseH(Out{}.h(), 4, 1, 0, 1, 1); },
        [](Out& y, S st) {
            return RiffleArrayInt_head(twrt::Array1D<int32_t>{7, 8}.h(), y.h(), 3, st);
        }};
    for (size_t i = 0; i < std::size(resized); ++i) {
        Out y{1, 2};
        RandomState st{7, 8, 9};
        gResult = 0;
        TWRTFailResizeAt(1);
        EXPECT_EQ(resized[i](y, &st), OutOfMemoryErr) << i;
        TWRTFailResizeAt(0);
        EXPECT_EQ(gResult, i < 3 ? TWRTResizeFailed : 0) << i;
        EXPECT_EQ(st.s1, 7);
    }
}

// A record of zeros is a constant stream of 0.0: the polar samplers never accept a pair from it
// and give up instead of hanging; Poisson's tangent puts its candidate on the mean and accepts.
TEST(NoiseAndPatterns, ZeroRecordCannotHangTheRejectionSamplers) {
    Out y;
    RandomState st{0, 0, 0};
    EXPECT_EQ(GaussP(y, 3, &st, 0), NoConvergenceErr);  // after the spare it was given
    EXPECT_EQ(GammaNoiseH(y.h(), 3, 6, -1, &st), NoConvergenceErr);
    EXPECT_EQ(y.size(), 0);
    EXPECT_EQ(PoissonNoiseH(y.h(), 3, 40.5, -1, &st), 0);
    EXPECT_EQ(y.vec(), V(3, 40.0));
}

// A mean whose envelope overflows cannot be sampled; it must not pass inf or NaN off as draws.
TEST(NoiseAndPatterns, PoissonRefusesAMeanBeyondTheEnvelope) {
    // sqrt(2 m) overflows above about 9e307, m ln m above about 2.5e305.
    for (const double mean : {1e306, 1e308, std::numeric_limits<double>::infinity()}) {
        Out y{1, 2};
        RandomState st{1, 2, 3};
        EXPECT_EQ(PoissonNoiseH(y.h(), 3, mean, -1, &st), NoConvergenceErr) << mean;
        EXPECT_EQ(y.size(), 0);
    }
}

TEST(NoiseAndPatterns, UnipolarSquarePulseAndImpulse) {
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
    Out y;
    for (const Case& c : cases) {
        ASSERT_EQ(SquareP(y, c.n, c.duty, c.cycles, 3), 0) << c.duty;
        EXPECT_EQ(y.vec(), c.expected) << c.duty << " " << c.cycles;
    }
    ASSERT_EQ(PulseP(y, 6, 2, 3, -2), 0);
    EXPECT_EQ(y.vec(), (V{0, 0, -2, -2, -2, 0}));
    ASSERT_EQ(PulseP(y, 6, 6, 0, -2), 0);
    EXPECT_EQ(y.vec(), V(6, 0));
    ASSERT_EQ(ImpulseP(y, 4, 3, 5), 0);
    EXPECT_EQ(y.vec(), (V{0, 0, 0, 5}));
    ASSERT_EQ(RampPtrn85(y.h(), 1, 2.5, 2.5, 0, 1), 0);
    EXPECT_EQ(y.vec(), V{2.5});
}

// The sine pattern is the sine wave at cycles / length, and leaves the caller's phase alone.
TEST(NoiseAndPatterns, SinePatternIsTheWaveOnAPhaseCopy) {
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

}  // namespace
