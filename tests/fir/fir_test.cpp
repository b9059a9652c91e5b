// Check orders and failure outputs of the FIR design and filtering exports; the numerics are
// compared with SciPy in tests/reference/test_fir.py.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <limits>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/filter.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using V = std::vector<double>;
const double kInf = std::numeric_limits<double>::infinity();
const double kNaNIn = std::numeric_limits<double>::quiet_NaN();

class Fir : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(Fir, TruncatedSincChecksInOrderAndClampsTheType) {
    struct Row {
        double fs, fl, fh;
        int32_t taps, type, status, typeAfter;
    };
    const Row rows[] = {
        {1000, 100, 200, 0, 0, OrderNotPositiveErr, 0},
        {1000, 600, 700, 5, 2, CutoffAboveNyquistErr, 2},
        {1000, 100, 501, 5, 3, CutoffAboveNyquistErr, 3},
        {1000, 100, kNaNIn, 5, 0, 0, 0},  // lowpass: fh is replaced before the checks
        {1000, 0, 200, 5, 1, CutoffInvalidErr, 1},
        {-1, 100, 200, 5, 0, CutoffAboveNyquistErr, 0},
        {1000, 200, 200, 5, 2, CutoffInvalidErr, 2},
        {1000, 100, 200, 6, 1, EvenTapsErr, 1},
        {1000, 100, 200, 6, 3, EvenTapsErr, 3},
        {1000, 100, 200, 6, 2, 0, 2},
        {1000, 100, 200, 6, 7, EvenTapsErr, 3},  // 7 clamps to bandstop
        {1000, 100, 200, 7, -1, 0, 0},
    };
    for (const Row& r : rows) {
        Array1D<double> h{1.0, 2.0};
        double fs = r.fs, fl = r.fl, fh = r.fh;
        int32_t taps = r.taps, type = r.type, status = 1;
        EXPECT_EQ(FIRCoefs(&fs, &fl, &fh, &taps, h.h(), &type, &status), 0);
        EXPECT_EQ(status, r.status) << r.taps << " " << r.type;
        EXPECT_EQ(type, r.typeAfter);
        EXPECT_EQ(h.size(), r.status == 0 ? r.taps : 0);
    }
    // One lowpass tap is w / pi; a failed host resize is OutOfMemoryErr.
    Array1D<double> h;
    double fs = 1000, fl = 123, fh = 0;
    int32_t taps = 1, type = 0, status = 1;
    FIRCoefs(&fs, &fl, &fh, &taps, h.h(), &type, &status);
    ASSERT_EQ(h.size(), 1);
    EXPECT_EQ(h[0], 2 * 3.14159265358979323846 * 123 / 1000 / 3.14159265358979323846);
    TWRTFailResizeAt(1);
    FIRCoefs(&fs, &fl, &fh, &taps, h.h(), &type, &status);
    EXPECT_EQ(status, OutOfMemoryErr);
}

struct Band {
    double gain, lower, upper, weight;
};

struct ParksResult {
    int32_t ret, status;
    std::vector<double> h;
    double deviation;
};

ParksResult RunParks(int32_t taps, double fs, const std::vector<Band>& bands, int32_t kind, int32_t limit) {
    Array1D<Band> b(bands);
    Array1D<double> h{1.0, 2.0, 3.0};
    ParksResult r{0, 1, {}, 0.0};
    r.ret = Parks(&taps, &fs, b.h(), &kind, h.h(), &r.deviation, &limit, &r.status);
    r.h = h.vec();
    return r;
}

TEST_P(Fir, EquirippleRefusalsEmptyHAndGiveNaN) {
    const std::vector<Band> low{{1, 0, 0.2, 1}, {0, 0.3, 0.5, 1}};
    struct Row {
        const char* what;
        int32_t taps;
        double fs;
        std::vector<Band> bands;
        int32_t kind, status;
    };
    const Row rows[] = {
        {"infinite fs", 21, kInf, low, 0, DesignParameterErr},
        {"NaN weight", 0, 1, {{1, 0, 0.2, kNaNIn}, {0, 0.3, 0.5, 1}}, 0, DesignParameterErr},
        {"no taps", 0, 1, low, 0, OrderNotPositiveErr},
        {"no band", 21, 1, {}, 0, CutoffInvalidErr},
        {"two taps", 2, -1, low, 0, DesignParameterErr},
        {"fs", 21, -1, low, 0, CutoffInvalidErr},
        {"negative gain", 21, 1, {{-1, 0, 0.2, 1}, {0, 0.3, 0.5, 1}}, 0, CutoffInvalidErr},
        {"zero weight", 21, 1, {{1, 0, 0.2, 0}, {0, 0.3, 0.5, 1}}, 0, CutoffInvalidErr},
        {"above fs/2", 21, 1, {{1, 0, 0.2, 1}, {0, 0.3, 0.6, 1}}, 0, CutoffAboveNyquistErr},
        {"overlap", 21, 1, {{1, 0, 0.3, 1}, {0, 0.3, 0.5, 1}}, 0, CutoffInvalidErr},
        {"multiband start", 21, 1, {{1, 0.01, 0.2, 1}, {0, 0.3, 0.5, 1}}, 0, DesignParameterErr},
        {"multiband end", 21, 1000, {{1, 0, 200, 1}, {0, 300, 498.9, 1}}, 0, DesignParameterErr},
        {"even highpass", 20, 1, {{0, 0, 0.2, 1}, {1, 0.3, 0.5, 1}}, 0, EvenTapsErr},
        {"differentiator start", 21, 1, {{1, 0.1, 0.4, 1}}, 1, DesignParameterErr},
        {"differentiator even end", 20, 1, {{1, 0, 0.45, 1}}, 1, DesignParameterErr},
        {"differentiator odd end", 21, 1, {{1, 0, 0.495, 1}}, 1, DesignParameterErr},
        {"Hilbert start", 21, 1, {{1, 0, 0.4, 1}}, 2, DesignParameterErr},
        {"Hilbert even end", 20, 1, {{1, 0.05, 0.45, 1}}, 2, DesignParameterErr},
        {"Hilbert odd end", 21, 1, {{1, 0.05, 0.4995, 1}}, 2, DesignParameterErr},
        {"unknown kind", 21, 1, low, 3, DesignParameterErr},
        {"too long", 4093, 1, low, 0, OutOfMemoryErr},
        // Beyond double precision: the levelled error falls, and the exchange gives up at once.
        {"falling level", 1501, 1, {{1, 0, 0.1, 1}, {0, 0.11, 0.5, 1}}, 0, DesignParameterErr},
    };
    for (const Row& r : rows) {
        const ParksResult p = RunParks(r.taps, r.fs, r.bands, r.kind, 100);
        EXPECT_EQ(p.status, r.status) << r.what;
        EXPECT_EQ(p.ret, r.status == OutOfMemoryErr ? 2 : 0) << r.what;
        EXPECT_TRUE(p.h.empty()) << r.what;
        EXPECT_TRUE(twtest::IsFailureNaN(p.deviation)) << r.what;
    }
    // Within 0.001 fs of fs/2 (units of fs) a multiband design is accepted.
    EXPECT_EQ(RunParks(21, 1000, {{1, 0, 200, 1}, {0, 300, 499.1, 1}}, 0, 100).status, 0);
    TWRTFailResizeAt(1);
    const ParksResult p = RunParks(21, 1, low, 0, 100);
    EXPECT_EQ(p.status, OutOfMemoryErr);
    EXPECT_EQ(p.ret, 2);
}

TEST_P(Fir, NarrowbandDesignRefusals) {
    struct Row {
        double f1, f2, centre, ripple, attenuation;
        int32_t type;
    };
    const Row rows[] = {
        {10, 20, 0, 0.01, 60, 4}, {20, 10, 0, 0.01, 60, 0}, {10, 500, 0, 0.01, 60, 0}, {10, 20, 0, 0, 60, 0},
        {10, 20, 0, 0.01, kInf, 0}, {0, 20, 100, 0.01, 60, 2}, {600, 10, 0, 0.01, 60, 1},
    };
    for (const Row& r : rows) {
        Array1D<double> model{1.0, 2.0}, image{3.0};
        NarrowFilterSpec spec{9, 9, model.h(), image.h()};
        double fs = 1000, f1 = r.f1, f2 = r.f2, c = r.centre, ripple = r.ripple, att = r.attenuation;
        int32_t type = r.type, status = 0;
        FIRNarrowCoef_head(&fs, &f1, &f2, &c, &ripple, &att, &type, &spec, &status);
        EXPECT_EQ(status, DesignParameterErr) << r.f1 << " " << r.f2 << " " << r.type;
        EXPECT_EQ(spec.interpolation, 0);
        EXPECT_EQ(model.size(), 0);
        EXPECT_EQ(image.size(), 0);
    }
    // The record a failed design leaves has no taps to run.
    Array1D<double> model, image, x{1.0, 2.0}, y{4.0};
    NarrowFilterSpec spec{0, 0, model.h(), image.h()};
    int32_t status = 0;
    FIRnarrowFilter_head(x.h(), &spec, y.h(), &status);
    EXPECT_EQ(status, EmptyArrayErr);
    EXPECT_EQ(y.size(), 0);
}

TEST_P(Fir, MultiRateStatusesShrinkOutputsAndZeroCounters) {
    struct Row {
        const char* what;
        int32_t taps, mode, L, M, delay;
        uint8_t reset, compensate;
        int32_t stateCells, status;
    };
    const Row rows[] = {
        {"no taps", 0, 0, 1, 1, 0, 1, 0, 0, OrderNotPositiveErr},
        {"L", 5, 1, 0, 1, 0, 1, 0, 0, BadDataRangeErr},
        {"M", 5, 2, 1, 0, 0, 1, 0, 0, BadDataRangeErr},
        {"mode", 5, 4, 1, 1, 0, 1, 0, 0, InvalidSelectorErr},
        {"delay", 5, 0, 1, 1, -1, 0, 0, 4, NegativeArgumentErr},
        {"even taps", 4, 0, 1, 1, 0, 1, 1, 0, EvenTapsErr},
        {"state", 5, 2, 1, 2, 0, 0, 0, 3, StateSizeErr},  // needs ceil(5 / 2) + 1 = 4
        {"state", 5, 1, 2, 1, 0, 0, 0, 2, StateSizeErr},  // needs 3
    };
    for (const Row& r : rows) {
        Array1D<double> x{1, 2, 3, 4, 5, 6}, y{1.0}, state(V(static_cast<size_t>(r.stateCells), 0.5)),
            h(V(static_cast<size_t>(r.taps), 1.0));
        uint8_t reset = r.reset, compensate = r.compensate;
        int32_t delay = r.delay, phase = 1;
        EXPECT_EQ(ppMultiRateFIRH_DBL(x.h(), y.h(), state.h(), r.mode, r.L, r.M, h.h(), 1.0, &reset, &compensate,
                                      &delay, &phase),
                  r.status)
            << r.what;
        EXPECT_EQ(y.size(), 0) << r.what;
        EXPECT_EQ(state.size(), 0) << r.what;
        EXPECT_EQ(delay, 0);
        EXPECT_EQ(phase, 0);
    }
    // An empty block is a warning; the state is still created.
    Array1D<std::complex<float>> x, y, state;
    Array1D<float> h{1, 2, 3};
    uint8_t reset = 0, compensate = 0;
    int32_t delay = 0, phase = 0;
    EXPECT_EQ(ppMultiRateFIRH_CSG(x.h(), y.h(), state.h(), 3, 2, 3, h.h(), 1.0f, &reset, &compensate, &delay, &phase),
              EmptyInputWarn);
    EXPECT_EQ(y.size(), 0);
    EXPECT_EQ(state.size(), 2);
}

TEST_P(Fir, SinglePurposeStreamsCheckTheirState) {
    Array1D<double> x{1, 2, 3, 4, 5}, h{1, 1, 1, 1, 1}, y{9.0}, wrong{0.0, 0.0};
    int32_t delay = 0;
    EXPECT_EQ(InterpolatorFIRH(x.h(), y.h(), 1.0, 2, h.h(), wrong.h(), 0, &delay), RateStateSizeErr);
    EXPECT_EQ(y.size(), 0);
    EXPECT_EQ(wrong.size(), 0);
    Array1D<double> w2{0.0, 0.0, 0.0};
    EXPECT_EQ(DecimatorFIRH(x.h(), y.h(), 1.0, 2, h.h(), w2.h(), 0, 0, &delay), RateStateSizeErr);
    Array1D<double> w3(V(7, 0.0));
    EXPECT_EQ(InterpolatedFIRH(x.h(), y.h(), 2, 1.0, h.h(), w3.h(), 0, &delay), RateStateSizeErr);
    // An empty block: success, empty y, state untouched.
    Array1D<double> none, state(V(3, 0.25));
    y = Array1D<double>{1.0, 2.0};
    EXPECT_EQ(InterpolatorFIRH(none.h(), y.h(), 1.0, 2, h.h(), state.h(), 0, &delay), 0);
    EXPECT_EQ(y.size(), 0);
    EXPECT_EQ(state.vec(), V(3, 0.25));
    // The decimator keeps its counter as a real number in the last cell: start phase 3 of M = 2
    // reduces to 1, so the counter starts at 1 and the first output comes with the second input.
    Array1D<double> st;
    EXPECT_EQ(DecimatorFIRH(x.h(), y.h(), 5.0, 2, h.h(), st.h(), 1, 3, &delay), 0);
    ASSERT_EQ(st.size(), 4);
    EXPECT_EQ(y.vec(), V({3.0, 10.0}));  // x0 + x1, x0 + .. + x3 (h is 5 ones; the gain is unused)
    // The running sums of the outputs still to come (at inputs 5, 7, 9), then the counter: five
    // inputs from counter 1 end at 0.
    EXPECT_EQ(st.vec(), V({2.0 + 3 + 4 + 5, 4.0 + 5, 0.0, 0.0}));
}

INSTANTIATE_TEST_SUITE_P(Placement, Fir, ::testing::Bool(), twtest::PlacementName);

}  // namespace
