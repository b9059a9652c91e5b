// Check orders of the boundary operations, triggers on hand-built channels, pulse parameters of
// trapezoids with crossings known in closed form.
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>
#include <functional>
#include <limits>

#include "common/helpers.hpp"
#include "twanlys/signal.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using twrt::Array2D;
using V = std::vector<double>;
using I = std::vector<int32_t>;
const double kNaNIn = std::numeric_limits<double>::quiet_NaN();

class SignalUtil : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(SignalUtil, BoundaryOperationsCheckInTheirOwnOrder) {
    using Call = std::function<int32_t(Array1D<double>&, const Array1D<double>&, const Array1D<double>&,
                                       double, int32_t)>;
    const Call d85 = [](auto& x, auto& i, auto& f, double dt, int32_t m) {
        return Derivative85(x.h(), i.h(), f.h(), &dt, m);
    };
    const Call i90 = [](auto& x, auto& i, auto& f, double dt, int32_t m) {
        return Integral90(x.h(), i.h(), f.h(), dt, m);
    };
    const Call i17 = [](auto& x, auto&, auto&, double dt, int32_t m) { return Integral_2017(x.h(), dt, m); };
    const Call d = [](auto& x, auto& i, auto& f, double dt, int32_t) {
        int32_t s = 1;
        Derivative(x.h(), i.h(), f.h(), &dt, &s);
        return s;
    };
    const Call in = [](auto& x, auto& i, auto& f, double dt, int32_t) {
        int32_t s = 1;
        Integral(x.h(), i.h(), f.h(), &dt, &s);
        return s;
    };
    struct Case {
        const Call* call;
        int32_t nx, ni, nf;
        double dt;
        int32_t method, status;
    };
    // clang-format off
    const Case cases[] = {
        {&d85, 0, 2, 2, 0, 0, EmptyArrayErr}, {&d85, 3, 2, 2, 0, 0, SampleIntervalErr},
        {&d85, 3, 2, 2, -1, 0, SampleIntervalErr}, {&d85, 3, 2, 2, kNaNIn, 0, SampleIntervalErr},
        {&d85, 3, 0, 0, 1, 4, InvalidSelectorErr}, {&d85, 3, 2, 2, 1, -1, InvalidSelectorErr},
        {&d85, 3, 0, 1, 1, 0, EmptyArrayErr}, {&d85, 3, 1, 0, 1, 0, EmptyArrayErr},
        {&d85, 3, 0, 1, 1, 1, TooFewSamples2Err}, {&d85, 3, 2, 1, 1, 1, TooFewSamples2Err},
        {&d85, 3, 0, 0, 1, 2, EmptyArrayErr}, {&d85, 3, 0, 1, 1, 2, 0},
        {&d85, 3, 0, 0, 1, 3, EmptyArrayErr}, {&d85, 3, 1, 0, 1, 3, 0},
        {&d, 0, 1, 1, 0, 0, SampleIntervalErr}, {&d, 0, 1, 1, 1, 0, EmptyArrayErr},
        {&d, 3, 0, 0, 1, 0, 0}, {&in, 0, 1, 1, 0, 0, EmptyArrayErr},
        {&in, 3, 1, 1, 0, 0, SampleIntervalErr}, {&in, 3, 0, 1, 1, 0, EmptyArrayErr},
        {&in, 3, 1, 0, 1, 0, EmptyArrayErr}, {&i90, 0, 2, 2, 0, 0, SampleIntervalErr},
        {&i90, 0, 2, 2, 1, 0, EmptyArrayErr}, {&i90, 3, 0, 0, 1, 6, InvalidSelectorErr},
        {&i90, 3, 0, 0, 1, 0, EmptyArrayErr}, {&i90, 3, 1, 0, 1, 0, 0},
        {&i90, 3, 1, 0, 1, 1, EmptyArrayErr}, {&i90, 3, 1, 0, 1, 2, TooFewSamples2Err},
        {&i90, 3, 2, 0, 1, 2, EmptyArrayErr}, {&i90, 3, 2, 1, 1, 3, TooFewSamples2Err},
        {&i90, 3, 0, 0, 1, 4, 0}, {&i17, 0, 0, 0, 0, 0, SampleIntervalErr},
        {&i17, 0, 0, 0, 1, 9, EmptyArrayErr}, {&i17, 3, 0, 0, 1, 6, InvalidSelectorErr},
    };
    // clang-format on
    for (const Case& c : cases) {
        Array1D<double> x(V(static_cast<size_t>(c.nx), 1.5));
        const Array1D<double> init(V(static_cast<size_t>(c.ni), 1.0)), fin(V(static_cast<size_t>(c.nf), 2.0));
        const int idx = static_cast<int>(&c - cases);
        EXPECT_EQ((*c.call)(x, init, fin, c.dt, c.method), c.status) << "case " << idx;
        EXPECT_EQ(x.size(), c.status == 0 ? c.nx : 0) << "case " << idx;
    }
}

TEST_P(SignalUtil, DerivativeReadsMissingBoundariesAsZero) {
    Array1D<double> x{1, 2, 3};
    const Array1D<double> none;
    double dt = 1;
    int32_t s = 1;
    Derivative(x.h(), none.h(), none.h(), &dt, &s);
    EXPECT_EQ(s, 0);
    EXPECT_EQ(x.vec(), (V{1, 1, -1}));
}

struct TriggerCase {
    int32_t maximum;
    I armedIn, indices, counts, armedOut;
};

TEST_P(SignalUtil, TriggersArmFireAndStopAtTheMaximum) {
    // Row 0 rises through 1 with hysteresis 0.5; row 1 falls through 0 with hysteresis -1 (taken
    // as 1); row 2 lies past the settings arrays: level 0, hysteresis 0, rising.
    const Array2D<double> x(3, 9, {0, 2,  0.6, 2,  0.4, 1, 1.5, 0,  1,  //
                                   0, 2,  0.5, -1, 1.5, 0, 0,   0,  0,  //
                                   0, -1, 0,   0,  -2,  3, -1,  -1, -1});
    const Array1D<double> level{1, 0}, hysteresis{0.5, -1};
    const Array1D<int32_t> slope{1, 0};
    const TriggerCase cases[] = {
        {4, {0, 0}, {1, 5, 8, 0, 3, 5, 0, 0, 2, 5, 0, 0}, {3, 2, 2}, {0, 0, 1}},
        {1, {0}, {1, 3, 2}, {1, 1, 1}, {0, 0, 0}},
        // Row 2 starts at its level: armed it fires there, unarmed (above) it does not.
        {2, {1, 0, 1}, {1, 5, 3, 5, 0, 2}, {2, 2, 2}, {0, 0, 0}},
        {0, {1, 0, 1}, {}, {0, 0, 0}, {1, 0, 1}},
    };
    for (const TriggerCase& c : cases) {
        Array1D<int32_t> armed(c.armedIn), counts{9}, found;
        Array2D<int32_t> indices(1, 1, {9});
        EXPECT_EQ(Triggerh_86(x.h(), level.h(), armed.h(), hysteresis.h(), slope.h(), c.maximum, indices.h(),
                              counts.h(), found.h()),
                  0);
        EXPECT_EQ(indices.rows(), 3);
        EXPECT_EQ(indices.cols(), c.maximum);
        EXPECT_EQ(indices.vec(), c.indices) << "maximum " << c.maximum;
        EXPECT_EQ(counts.vec(), c.counts);
        EXPECT_EQ(armed.vec(), c.armedOut);
        I expectFound;
        for (int32_t n : c.counts) expectFound.push_back(n != 0);
        EXPECT_EQ(found.vec(), expectFound);
    }
}

TEST_P(SignalUtil, PackedTriggersShareOnePositionAndStoreFifty) {
    const Array1D<double> level{1, 0}, hysteresis{0.5, 1};
    const Array1D<int32_t> slope{1, 0};
    {
        // Row 0 starts armed from its previous last sample; row 1's previous arms it too but it
        // never fires, so it appends one 0; row 2 has no previous sample and starts unarmed.
        const Array2D<double> x(3, 4, {1.2, 0.4, 1.0, 0.0, 0.5, 0.5, 0.5, 0.5, 0, -1, 2, 3});
        const Array1D<double> previous{0.0, 2.0};
        Array1D<int32_t> indices, counts, found;
        Array1D<double> last;
        int32_t s = 1;
        Triggerh(x.h(), level.h(), previous.h(), hysteresis.h(), slope.h(), 3, indices.h(), counts.h(),
                 found.h(), last.h(), &s);
        EXPECT_EQ(s, 0);
        EXPECT_EQ(indices.vec(), (I{0, 2, 0, 2, 0, 0, 0, 0, 0}));
        EXPECT_EQ(counts.vec(), (I{2, 0, 1}));
        EXPECT_EQ(found.vec(), (I{1, 0, 1}));
        EXPECT_EQ(last.vec(), (V{0.0, 0.5, 3}));
    }
    {
        // 49 triggers in row 0 and 3 in row 1: the first of row 1 takes position 49, the rest
        // only count.
        V v(200, -1);
        for (int j = 1; j < 98; j += 2) v[static_cast<size_t>(j)] = 1;
        for (int j = 101; j < 106; j += 2) v[static_cast<size_t>(j)] = 1;
        const Array2D<double> x(2, 100, v);
        const Array1D<double> none;
        const Array1D<int32_t> rising{1, 1};
        Array1D<int32_t> indices, counts, found;
        Array1D<double> last;
        int32_t s = 1;
        Triggerh(x.h(), none.h(), none.h(), none.h(), rising.h(), 50, indices.h(), counts.h(), found.h(),
                 last.h(), &s);
        I expected(100, 0);
        for (int p = 0; p < 49; ++p) expected[static_cast<size_t>(p)] = 2 * p + 1;
        expected[49] = 1;
        EXPECT_EQ(indices.vec(), expected);
        EXPECT_EQ(counts.vec(), (I{49, 3}));
    }
}

TEST_P(SignalUtil, TriggersRefuseANegativeStoredCount) {
    const Array2D<double> x(1, 2, {0, 1});
    Array1D<double> level, last{4};
    const int32_t minus = -1;
    std::memcpy(*level.h(), &minus, sizeof minus);
    Array1D<int32_t> armed{1}, slope{1}, counts{1}, found{1}, packed{1};
    Array2D<int32_t> indices(1, 1, {1});
    EXPECT_EQ(
        Triggerh_86(x.h(), level.h(), armed.h(), level.h(), slope.h(), 1, indices.h(), counts.h(), found.h()),
        NegativeSizeErr);
    EXPECT_EQ(indices.rows(), 0);
    EXPECT_EQ(counts.size(), 0);
    int32_t s = 0;
    Triggerh(x.h(), level.h(), level.h(), level.h(), slope.h(), 1, packed.h(), counts.h(), found.h(),
             last.h(), &s);
    EXPECT_EQ(s, NegativeSizeErr);
    EXPECT_EQ(last.size(), 0);
}

TEST_P(SignalUtil, TriggersReportAFailedResizeAsOutOfMemory) {
    const Array2D<double> x(2, 3, {0, 2, 0, 2, 0, 2});
    const Array1D<double> level{1, 1}, hysteresis, previous{0, 0};
    const Array1D<int32_t> slope{1, 0};
    // Triggerh_86 resizes armed, indices, counts, found; Triggerh indices, counts, found, last.
    for (int32_t k = 1; k <= 4; ++k) {
        Array1D<int32_t> armed{0, 0}, counts, found, packed;
        Array2D<int32_t> indices;
        Array1D<double> last;
        TWRTFailResizeAt(k);
        const int32_t s86 = Triggerh_86(x.h(), level.h(), armed.h(), hysteresis.h(), slope.h(), 2, indices.h(),
                                        counts.h(), found.h());
        TWRTFailResizeAt(k);
        int32_t s = 0;
        Triggerh(x.h(), level.h(), previous.h(), hysteresis.h(), slope.h(), 2, packed.h(), counts.h(), found.h(),
                 last.h(), &s);
        TWRTFailResizeAt(0);
        EXPECT_EQ(s86, OutOfMemoryErr) << "resize " << k;
        EXPECT_EQ(s, OutOfMemoryErr) << "resize " << k;
        EXPECT_EQ(armed.size() + indices.rows() + packed.size() + counts.size() + found.size() + last.size(), 0);
    }
}

struct Pulse {
    double top, base, amplitude, delay, width, slew, fall, rise, overshoot, undershoot;
    int32_t status;
};

Pulse Measure(const V& v) {
    const Array1D<double> x(v);
    Pulse p{};
    p.status = 1;
    PulseParameters(x.h(), &p.top, &p.base, &p.amplitude, &p.delay, &p.width, &p.slew, &p.fall, &p.rise,
                    &p.overshoot, &p.undershoot, &p.status);
    return p;
}

// 0 until 10, up to 1 over 10 samples, 1 until 30, down over 5 samples (unless `fall` is false).
V Trapezoid(int n, bool fall) {
    V v(static_cast<size_t>(n), 0.0);
    for (int i = 10; i < n; ++i)
        v[static_cast<size_t>(i)] = i < 20               ? (i - 10) / 10.0
                                    : (!fall || i <= 30) ? 1.0
                                                         : std::max(0.0, 1 - (i - 30) / 5.0);
    return v;
}

TEST_P(SignalUtil, PulseParametersOfTrapezoids) {
    struct Case {
        const char* name;
        V x;
        double sign, max, topBin;  // top level, as the centre of its bin
        bool fall;
    };
    V overshoot = Trapezoid(40, true);
    overshoot[22] = 1.3;
    V negative = Trapezoid(40, true);
    for (double& v : negative) v = -v;
    const Case cases[] = {
        {"positive", Trapezoid(40, true), 1, 1, 100, true},
        {"overshoot", overshoot, 1, 1.3, 77, true},
        {"negative", negative, -1, 1, 100, true},
        {"no fall", Trapezoid(30, false), 1, 1, 100, false},
    };
    for (const Case& c : cases) {
        // Bin centres over [0, max] of the positive shape; the ramps cross level l at 10 + 10 l and
        // 30 + 5 (1 - l).
        const double base = 0.5 * c.max / 101, top = (c.topBin + 0.5) * c.max / 101, amp = top - base;
        const double l10 = 0.1 * amp + base, l50 = 0.5 * amp + base, l90 = 0.9 * amp + base;
        const Pulse p = Measure(c.x);
        const double tol = 1e-12;
        EXPECT_EQ(p.status, 0) << c.name;
        EXPECT_NEAR(p.amplitude, c.sign * amp, tol) << c.name;
        EXPECT_NEAR(p.top, c.sign > 0 ? top : -top, tol) << c.name;
        EXPECT_NEAR(p.base, c.sign > 0 ? base : -base, tol) << c.name;
        EXPECT_NEAR(p.overshoot, c.sign > 0 ? c.max - top : base, tol) << c.name;
        EXPECT_NEAR(p.undershoot, c.sign > 0 ? base : 1 - top, tol) << c.name;
        EXPECT_NEAR(p.delay, 10 + 10 * l50, tol) << c.name;
        EXPECT_NEAR(p.rise, 10 * (l90 - l10), tol) << c.name;
        EXPECT_NEAR(p.slew, c.sign * amp * 0.8 / (10 * (l90 - l10)), tol) << c.name;
        if (c.fall) {
            EXPECT_NEAR(p.width, 30 + 5 * (1 - l50) - (10 + 10 * l50), tol) << c.name;
            EXPECT_NEAR(p.fall, 5 * (l90 - l10), tol) << c.name;
        } else {
            // No way down: the width runs to the last sample, and the fall is n - 1 - hi + 1 with
            // hi the last sample.
            EXPECT_NEAR(p.width, 29 - (10 + 10 * l50), tol) << c.name;
            EXPECT_EQ(p.fall, 1.0) << c.name;
        }
    }
    const Pulse flat = Measure({2.5, 2.5, 2.5});
    EXPECT_EQ(flat.status, 0);
    EXPECT_EQ(flat.top, 2.5);
    EXPECT_EQ(flat.base, 2.5);
    EXPECT_EQ(flat.amplitude + flat.delay + flat.width + flat.rise + flat.fall + flat.slew, 0.0);
    const Pulse none = Measure({});
    EXPECT_EQ(none.status, EmptyArrayErr);
    for (double r : {none.top, none.base, none.amplitude, none.delay, none.width, none.slew, none.fall,
                     none.rise, none.overshoot, none.undershoot})
        EXPECT_EQ(std::bit_cast<uint64_t>(r), 0u);
}

INSTANTIATE_TEST_SUITE_P(Placements, SignalUtil, ::testing::Values(false, true), twtest::PlacementName);

}  // namespace
