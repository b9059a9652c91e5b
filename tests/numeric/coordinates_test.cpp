// Coordinate exports: check orders, the failure contract, and exact cases.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/numeric.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using twrt::Array2D;
using V = std::vector<double>;

class Coordinates : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(Coordinates, PointStatusesEmptyTheOutputs) {
    struct Case {
        const char* what;
        V x, y;
        int32_t sequence;
        uint16_t kind, conversion, unit;
        int32_t status;
        char only;  // 'e' Euler, 'd' direct, 'c' conversion; 0 all three
    };
    const V p{1, 2, 3};
    const Case cases[] = {
        {"empty before mismatch", {}, p, 99, 9, 9, 9, EmptyArrayErr, 0},
        {"mismatch", {1, 2}, p, 99, 9, 9, 9, SizeMismatchErr, 0},
        {"sequence 12", p, p, 12, 1, 0, 0, InvalidSelectorErr, 'e'},
        {"sequence -1 as unsigned", p, p, -1, 1, 0, 0, InvalidSelectorErr, 'e'},
        {"kind 2", p, p, 10, 2, 0, 0, InvalidSelectorErr, 'd'},
        {"conversion 4", p, p, 10, 1, 4, 0, InvalidSelectorErr, 'c'},
        {"unit 2", p, p, 10, 1, 0, 2, InvalidSelectorErr, 'c'},
        {"valid", p, p, 11, 1, 3, 1, 0, 0},
    };
    const Array2D<double> identity(3, 3, {1, 0, 0, 0, 1, 0, 0, 0, 1});
    for (const Case& c : cases) {
        const Array1D<double> x(c.x), y(c.y), z(c.y);
        Array1D<double> a{9}, b{9}, d{9};
        const auto check = [&](int32_t status, const char* which) {
            if (c.only != 0 && c.only != which[0]) return;
            EXPECT_EQ(status, c.status) << c.what << ": " << which;
            const int32_t n = c.status == 0 ? 3 : 0;
            EXPECT_EQ(a.size(), n) << c.what << ": " << which;
            EXPECT_EQ(d.size(), n) << c.what << ": " << which;
        };
        check(CoordRotationEuler2011_head(x.h(), y.h(), z.h(), 0.1, 0.2, 0.3, c.sequence, a.h(), b.h(), d.h()),
              "e");
        check(CoordRotationDirect_head(x.h(), y.h(), z.h(), identity.h(), c.kind, a.h(), b.h(), d.h()), "d");
        check(CoordConversion_head(x.h(), y.h(), z.h(), c.conversion, c.unit, a.h(), b.h(), d.h()), "c");
    }
    const Array1D<double> x{1, 2}, y{3, 4};
    Array1D<double> a, b;
    const Array2D<double> wide(3, 4);
    EXPECT_EQ(CoordRotationDirect_head(x.h(), y.h(), y.h(), wide.h(), 1, a.h(), b.h(), b.h()), SizeMismatchErr);
    EXPECT_EQ(CartesianShift2D_head(x.h(), y.h(), 1, -1, a.h(), b.h()), 0);
    EXPECT_EQ(a.vec(), (V{2, 3}));
    EXPECT_EQ(b.vec(), (V{2, 3}));
}

TEST_P(Coordinates, DirectionMatrixChecks) {
    const Array2D<double> wrong(2, 3, {1, 0, 0, 0, 1, 0}), empty;
    for (const Array2D<double>* m : {&wrong, &empty}) {
        double a = 0, b = 0, g = 0;
        EXPECT_EQ(Direction2Euler_head(m->h(), &a, &b, &g), SizeMismatchErr);
        EXPECT_TRUE(twtest::IsFailureNaN(a) && twtest::IsFailureNaN(b) && twtest::IsFailureNaN(g));
    }
    Array2D<double> m(1, 1, {5});
    EXPECT_EQ(Euler2Direction2011_head(0.1, 0.2, 0.3, 12, m.h()), InvalidSelectorErr);
    EXPECT_EQ(m.rows(), 0);
    EXPECT_EQ(m.cols(), 0);

    // The identity is at the lock of every repeated-axis sequence: all three angles 0, no NaN.
    EXPECT_EQ(Euler2Direction_head(0, 0, 0, m.h()), 0);
    double a = 1, b = 1, g = 1;
    EXPECT_EQ(Direction2Euler_head(m.h(), &a, &b, &g), 0);
    EXPECT_EQ(V({a, b, g}), V({0, 0, 0}));
    // Z X Z about pi, pi, 0: the pivot is exactly -1.
    EXPECT_EQ(Euler2Direction_head(0.5, M_PI, 0.25, m.h()), 0);
    EXPECT_EQ(Direction2Euler_head(m.h(), &a, &b, &g), 0);
    EXPECT_EQ(b, M_PI);
    EXPECT_EQ(g, 0);
    EXPECT_NEAR(a, 0.25, 1e-15);  // first minus third at a pivot of -1 (with third 0)
}

TEST_P(Coordinates, OriginConvertsToZeros) {
    const Array1D<double> zero{0.0, -0.0}, zero2{0.0, 0.0};
    Array1D<double> r, t, p;
    EXPECT_EQ(CoordConversion_head(zero.h(), zero2.h(), zero2.h(), 0, 1, r.h(), t.h(), p.h()), 0);
    EXPECT_EQ(r.vec(), (V{0, 0}));
    EXPECT_EQ(t[0], 0);
    EXPECT_EQ(p[0], 0);
    EXPECT_EQ(t[1], 180);  // atan2(0, -0) in degrees: the plain formula, no special case
}

INSTANTIATE_TEST_SUITE_P(Placements, Coordinates, ::testing::Bool(), twtest::PlacementName);

}  // namespace
