// Numerical utility exports: check orders, statuses and the failure contract in both block
// placements (the values are checked against NumPy/SciPy in tests/reference/test_numeric.py).
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <functional>
#include <limits>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/numeric.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using twrt::Array2D;
using V = std::vector<double>;
const double kNaNIn = std::numeric_limits<double>::quiet_NaN();
constexpr double kOne = 1;

class Numeric : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(Numeric, InPlace) {
    using Call = std::function<int32_t(void**, double*)>;
    const Call range = [](void** h, double* r) { int32_t s = 1; Scale1DCIN(h, &r[0], &r[1], &s); return s; };
    const auto unit = [](double y) { return Call([y](void** h, double* r) { return unitVector80_head(h, y, r); }); };
    struct Case {
        Call call;
        V in;
        int32_t status;
        V out;
        double r0, r1;
    };
    const Case cases[] = {
        {range, V(5, kNaNIn), 0, V(5, kNaNIn), kNaNIn, kNaNIn},  // all NaN: data stay
        {range, {}, EmptyArrayErr, {}, kNaNIn, kNaNIn},
        {unit(2), {0, -0.0}, 0, {0, -0.0}, 0, 5},                          // norm 0: data stay
        {unit(0), {3, -1}, DegenerateDataErr, {}, kNaNIn, 5},
        {unit(kNaNIn), {3, -1}, NanInfErr, {}, kNaNIn, 5},
    };
    for (const Case& c : cases) {
        Array1D<double> x(c.in);
        double r[2] = {5, 5};
        EXPECT_EQ(c.call(x.h(), r), c.status);
        const V out = x.vec();
        EXPECT_EQ(out.size(), c.out.size());
        for (size_t i = 0; i < out.size(); ++i) EXPECT_TRUE(std::isnan(c.out[i]) ? std::isnan(out[i]) : out[i] == c.out[i]);
        EXPECT_TRUE(std::isnan(c.r0) ? std::isnan(r[0]) : r[0] == c.r0);
        EXPECT_TRUE(c.status == 0 || twtest::IsFailureNaN(r[0]));
        EXPECT_TRUE(std::isnan(c.r1) ? std::isnan(r[1]) : r[1] == c.r1);
    }
    Array2D<double> empty(0, 4);
    double sd = 0, mean = 0;
    int32_t s = 0;
    Norm2(empty.h(), &sd, &mean, &s);
    EXPECT_EQ(s, EmptyArrayErr);
    EXPECT_EQ(empty.cols(), 0);
    EXPECT_TRUE(twtest::IsFailureNaN(sd) && twtest::IsFailureNaN(mean));
    Array1D<double> x{1, 2}, shorter{1}, none;
    PolarToRect1D_head(x.h(), shorter.h(), &s);
    EXPECT_EQ(s, EqSamplesErr);
    EXPECT_EQ(x.size() + shorter.size(), 0);
    RectToPolar1D_head(none.h(), shorter.h(), &s);
    EXPECT_EQ(s, EmptyArrayErr);
}

// A 3-D block as the host lays it out: three i32 dimensions, then the elements.
struct Block3D {
    explicit Block3D(const int32_t (&d)[3]) {
        const size_t n = static_cast<size_t>(std::max(d[0] * d[1] * d[2], 0));
        h = HostNewHandle(12 + 8 * n);
        std::memcpy(*h, d, 12);
        for (size_t i = 0; i < n; ++i) std::memcpy(static_cast<char*>(*h) + 12 + 8 * i, &kOne, 8);
    }
    ~Block3D() { HostDisposeHandle(h); }
    void** h;
};

TEST_P(Numeric, IntegrationCheckOrder) {
    struct Case {
        bool later;
        int32_t d[3];  // 1-D: n; 2-D: rows, cols; 3-D: d0, d1, d2 (unused dimensions 0)
        int steps;
        int32_t method, status;
    };
    const Case cases[] = {
        {false, {1}, 1, 9, InvalidSelectorErr},  // older 1-D: method before size
        {false, {1}, 1, -1, InvalidSelectorErr},
        {false, {4}, 1, 3, SizeMismatchErr},
        {true, {3}, 1, 6, SizeMismatchErr},      // later 1-D: size before method
        {true, {100}, 1, 6, InvalidSelectorErr},
        {true, {5}, 1, -1, InvalidSelectorErr},
        {true, {1}, 1, 4, SizeMismatchErr},
        {false, {0, 5}, 2, 9, EmptyArrayErr},    // 2-D: empty before the 3-sample minimum
        {false, {2, 10}, 2, 0, SizeMismatchErr},
        {false, {3, 3}, 1, 0, TooFewSamples2Err},
        {false, {3, 3}, 2, 4, InvalidSelectorErr},
        {false, {3, 3}, 2, 3, 0},                // older Bode closes short runs with lower rules
        {true, {3, 3}, 2, 2, 0},
        {true, {4, 6}, 2, 3, SizeMismatchErr},   // later Bode's start terms read five samples
        {false, {3, 0, 3}, 3, 0, EmptyArrayErr},
        {false, {3, 3, 2}, 3, 0, SizeMismatchErr},
        {false, {3, 4, 5}, 2, 0, TooFewSamples3Err},
        {false, {3, 4, 5}, 3, 7, InvalidSelectorErr},
        {true, {5, 5, 4}, 3, 3, SizeMismatchErr},
        {true, {5, 6, 7}, 3, 3, 0},
    };
    for (const Case& c : cases) {
        const Array1D<double> steps(V(c.steps, -0.5));
        const auto method = static_cast<uint16_t>(c.method);
        double result = 0, dt = 1;
        int32_t status = 1, m = c.method;
        if (c.d[1] == 0 && c.d[2] == 0) {
            const Array1D<double> x(V(c.d[0], 1.0));
            if (c.later)
                status = NumerIntegration_2017_head(x.h(), &dt, &m, &result);
            else
                NumerIntegration_head(x.h(), &dt, &m, &result, &status);
        } else if (c.d[2] == 0) {
            const Array2D<double> a(c.d[0], c.d[1], V(std::max(c.d[0] * c.d[1], 0), 1.0));
            status = (c.later ? NumerIntegration2D_2017_head : NumerIntegration2D_head)(a.h(), steps.h(), method, &result);
        } else {
            const Block3D a(c.d);
            status = (c.later ? NumerIntegration3D_2017_head : NumerIntegration3D_head)(a.h, steps.h(), method, &result);
        }
        EXPECT_EQ(status, c.status) << c.d[0] << " " << c.d[1] << " " << c.d[2] << " method " << c.method;
        EXPECT_EQ(twtest::IsFailureNaN(result), c.status < 0);
    }
}

TEST_P(Numeric, CoordinateCheckOrder) {
    struct Case {
        V x;
        int32_t sequence;
        uint16_t kind, conversion, unit;
        int32_t status;
        char only;  // 'e' Euler, 'd' direct, 'c' conversion; 0 all three
    };
    const V p{1, 2, 3};
    const Case cases[] = {
        {{}, 99, 9, 9, 9, EmptyArrayErr, 0},  // empty before the length mismatch
        {{1, 2}, 99, 9, 9, 9, SizeMismatchErr, 0},
        {p, 12, 1, 0, 0, InvalidSelectorErr, 'e'},
        {p, -1, 1, 0, 0, InvalidSelectorErr, 'e'},
        {p, 10, 2, 0, 0, InvalidSelectorErr, 'd'},
        {p, 10, 1, 4, 0, InvalidSelectorErr, 'c'},
        {p, 10, 1, 0, 2, InvalidSelectorErr, 'c'},
        {p, 11, 1, 3, 1, 0, 0},
    };
    const Array2D<double> identity(3, 3, {1, 0, 0, 0, 1, 0, 0, 0, 1}), wide(3, 4, V(12, 0.0));
    for (const Case& c : cases) {
        const Array1D<double> x(c.x), y(p), z(p);
        Array1D<double> a{9}, b{9}, d{9};
        const auto check = [&](int32_t status, char which) {
            if (c.only != 0 && c.only != which) return;
            EXPECT_EQ(status, c.status) << c.sequence << " " << which;
            EXPECT_EQ(a.size() + d.size(), c.status == 0 ? 6 : 0) << c.sequence << " " << which;
        };
        check(CoordRotationEuler2011_head(x.h(), y.h(), z.h(), 0.1, 0.2, 0.3, c.sequence, a.h(), b.h(), d.h()), 'e');
        check(CoordRotationDirect_head(x.h(), y.h(), z.h(), identity.h(), c.kind, a.h(), b.h(), d.h()), 'd');
        check(CoordConversion_head(x.h(), y.h(), z.h(), c.conversion, c.unit, a.h(), b.h(), d.h()), 'c');
        EXPECT_EQ(CoordRotationDirect_head(y.h(), y.h(), z.h(), wide.h(), 1, a.h(), b.h(), d.h()), SizeMismatchErr);
    }
    const Array2D<double> wrong(2, 3, V(6, 0.0)), empty;
    for (const Array2D<double>* m : {&wrong, &empty}) {
        double angles[3] = {0, 0, 0};
        EXPECT_EQ(Direction2Euler_head(m->h(), &angles[0], &angles[1], &angles[2]), SizeMismatchErr);
        for (double v : angles) EXPECT_TRUE(twtest::IsFailureNaN(v));
    }
    // Outputs that are also inputs: worked on in place, never read after the host moved them.
    Array1D<double> x{1, 2, 3}, y{4, 5, 6}, z{7, 8, 9}, nx, ny, nz;
    ASSERT_EQ(CoordRotationEuler2011_head(x.h(), y.h(), z.h(), 0.1, 0.2, 0.3, 4, nx.h(), ny.h(), nz.h()), 0);
    ASSERT_EQ(CoordRotationEuler2011_head(x.h(), y.h(), z.h(), 0.1, 0.2, 0.3, 4, x.h(), y.h(), z.h()), 0);
    EXPECT_TRUE(x.vec() == nx.vec() && y.vec() == ny.vec() && z.vec() == nz.vec());
    Array2D<double> m(1, 1, {5});
    EXPECT_EQ(Euler2Direction2011_head(0.1, 0.2, 0.3, 12, m.h()), InvalidSelectorErr);
    EXPECT_EQ(m.rows() + m.cols(), 0);
}

INSTANTIATE_TEST_SUITE_P(Placements, Numeric, ::testing::Bool(), twtest::PlacementName);

}  // namespace
