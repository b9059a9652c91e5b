// The in-place scaling exports: stated edge cases and the failure contract, in both placements.
// Values follow by hand from the stated forms.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <functional>
#include <limits>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/numeric.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using V = std::vector<double>;
using cd = std::complex<double>;
constexpr double kInf = std::numeric_limits<double>::infinity();
const double kNaNIn = std::numeric_limits<double>::quiet_NaN();

// Equal, NaN matching NaN.
void ExpectSame(const V& got, const V& want, const char* what) {
    ASSERT_EQ(got.size(), want.size()) << what;
    for (size_t i = 0; i < got.size(); ++i)
        EXPECT_TRUE(got[i] == want[i] || (std::isnan(got[i]) && std::isnan(want[i])))
            << what << " [" << i << "] " << got[i] << " vs " << want[i];
}

class Scaling : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

// One 1-D export called with data and two scalar results.
using Call = std::function<int32_t(void**, double*, double*)>;

TEST_P(Scaling, OneDimensionalCases) {
    double offset = 1, multiplier = 3;
    const Call scale = [](void** h, double* a, double* b) { int32_t s = 1; Scale1DCIN(h, a, b, &s); return s; };
    const Call peak = [](void** h, double* a, double*) { int32_t s = 1; QS1D(h, a, &s); return s; };
    const Call norm = [](void** h, double* a, double* b) { int32_t s = 1; Norm1(h, a, b, &s); return s; };
    const Call line = [&](void** h, double*, double*) { int32_t s = 1; Line1(h, &offset, &multiplier, &s); return s; };
    const Call unit2 = [](void** h, double* a, double*) { int32_t s = 1; unitVector_head(h, a, &s); return s; };
    const auto unit = [](double y) {
        return Call([y](void** h, double* a, double*) { return unitVector80_head(h, y, a); });
    };
    struct Case {
        const char* what;
        Call call;
        V in;
        int32_t status;
        V out;
        double r1, r2;  // scalar results (NaN: not written, or NaN expected)
    };
    const Case cases[] = {
        {"range", scale, {-4, 0, 6}, 0, {-1, -1 * (1 / 5.0), 1}, 1, 5},
        {"range skips NaN", scale, {1, kNaNIn, 3}, 0, {-1, kNaNIn, 1}, 2, 1},
        {"range constant", scale, {2, 2, 2}, 0, {0, 0, 0}, 2, 1},
        {"range all NaN", scale, {kNaNIn, kNaNIn}, 0, {kNaNIn, kNaNIn}, kNaNIn, kNaNIn},
        {"range empty", scale, {}, EmptyArrayErr, {}, kNaNIn, kNaNIn},
        {"peak", peak, {-4, 2, kNaNIn}, 0, {-1, 0.5, kNaNIn}, 4, kNaNIn},
        {"peak zeros", peak, {0, -0.0, 0}, 0, {0, -0.0, 0}, 0, kNaNIn},
        {"normalise", norm, {1, 3}, 0, {-1, 1}, 1, 2},
        {"normalise constant", norm, {2, 2, 2}, 0, {kNaNIn, kNaNIn, kNaNIn}, 0, 2},
        {"normalise empty", norm, {}, EmptyArrayErr, {}, kNaNIn, kNaNIn},
        {"line", line, {1, 2, -1}, 0, {4, 7, -2}, kNaNIn, kNaNIn},
        {"unit zeros", unit2, {0, 0}, 0, {0, 0}, 0, kNaNIn},
        {"unit 2", unit2, {3, -4}, 0, {3 * (1 / 5.0), -4 * (1 / 5.0)}, 5, kNaNIn},
        {"unit +inf", unit(kInf), {3, -1, 2}, 0, {1, -1 * (1 / 3.0), 2 * (1 / 3.0)}, 3, kNaNIn},
        {"unit -inf", unit(-kInf), {3, -1, 2}, 0, {3, -1, 2}, 1, kNaNIn},
        {"unit 1", unit(1), {3, -1, 4}, 0, {3 * (1 / 8.0), -1 * (1 / 8.0), 4 * (1 / 8.0)}, 8, kNaNIn},
        {"unit order 0", unit(0), {3, -1}, DegenerateDataErr, {}, kNaNIn, kNaNIn},
        {"unit order NaN", unit(kNaNIn), {3, -1}, NanInfErr, {}, kNaNIn, kNaNIn},
        {"unit empty", unit(2), {}, EmptyArrayErr, {}, kNaNIn, kNaNIn},
    };
    for (const Case& c : cases) {
        Array1D<double> x(c.in);
        double r1 = kNaNIn, r2 = kNaNIn;
        EXPECT_EQ(c.call(x.h(), &r1, &r2), c.status) << c.what;
        ExpectSame(x.vec(), c.out, c.what);
        ExpectSame({r1, r2}, {c.r1, c.r2}, c.what);
        if (c.status < 0) {
            EXPECT_TRUE(twtest::IsFailureNaN(r1)) << c.what;
        }
    }
}

TEST_P(Scaling, TwoDimensionalRunKeepsShapeAndFailsEmpty) {
    twrt::Array2D<double> a(2, 3, {1, 2, 3, 4, 5, 9});
    double offset = 0, scale = 0, m = 2, o = -1;
    int32_t s = 1;
    Scale(a.h(), &offset, &scale, &s);
    EXPECT_EQ(s, 0);
    EXPECT_EQ(offset, 5);
    EXPECT_EQ(scale, 4);
    ExpectSame(a.vec(), {-1, -0.75, -0.5, -0.25, 0, 1}, "Scale");
    EXPECT_EQ(a.rows(), 2);
    EXPECT_EQ(a.cols(), 3);
    LinEv(a.h(), &m, &o, &s);
    ExpectSame(a.vec(), {-3, -2.5, -2, -1.5, -1, 1}, "LinEv");
    double peak = 0;
    QScale(a.h(), &peak, &s);
    EXPECT_EQ(peak, 3);
    double sd = 0, mean = 0;
    twrt::Array2D<double> b(2, 2, {1, 3, 1, 3});
    Norm2(b.h(), &sd, &mean, &s);
    ExpectSame(b.vec(), {-1, 1, -1, 1}, "Norm2");
    EXPECT_EQ(sd, 1);
    EXPECT_EQ(mean, 2);

    twrt::Array2D<double> empty(0, 4);
    Norm2(empty.h(), &sd, &mean, &s);
    EXPECT_EQ(s, EmptyArrayErr);
    EXPECT_EQ(empty.cols(), 0);
    EXPECT_TRUE(twtest::IsFailureNaN(sd) && twtest::IsFailureNaN(mean));
}

TEST_P(Scaling, PolarPair) {
    Array1D<double> x{0, -0.0, 3, -1}, y{-0.0, 0, 4, 0};
    int32_t s = 1;
    RectToPolar1D_head(x.h(), y.h(), &s);
    EXPECT_EQ(s, 0);
    // The origin has phase +0, not atan2's pi for a negative zero.
    ExpectSame(x.vec(), {0, 0, 5, 1}, "magnitude");
    ExpectSame(y.vec(), {0, 0, std::atan2(4.0, 3.0), M_PI}, "phase");
    EXPECT_FALSE(std::signbit(y[1]));
    PolarToRect1D_head(x.h(), y.h(), &s);
    EXPECT_EQ(s, 0);
    EXPECT_NEAR(x[2], 3, 4e-15);
    EXPECT_NEAR(y[2], 4, 4e-15);
    EXPECT_EQ(x[3], -1);

    Array1D<double> a{1, 2}, b{1, 2, 3}, none;
    RectToPolar1D_head(a.h(), b.h(), &s);
    EXPECT_EQ(s, EqSamplesErr);
    EXPECT_EQ(a.size(), 0);
    EXPECT_EQ(b.size(), 0);
    Array1D<double> c{1, 2};
    PolarToRect1D_head(none.h(), c.h(), &s);
    EXPECT_EQ(s, EmptyArrayErr);
    EXPECT_EQ(c.size(), 0);
}

TEST_P(Scaling, ComplexUnitVector) {
    Array1D<cd> z{cd(3, 4), cd(0, 0)};
    double norm = 0;
    EXPECT_EQ(CxUnitVector_head(z.h(), &norm), 0);
    EXPECT_EQ(norm, 5);
    EXPECT_EQ(z[0], cd(3 * (1 / 5.0), 4 * (1 / 5.0)));
    Array1D<cd> w{cd(3, 4), cd(0, -2)};
    EXPECT_EQ(CxUnitVector80_head(w.h(), 1, &norm), 0);
    EXPECT_EQ(norm, 7);
    EXPECT_EQ(CxUnitVector80_head(w.h(), 0, &norm), DegenerateDataErr);
    EXPECT_EQ(w.size(), 0);
}

INSTANTIATE_TEST_SUITE_P(Placements, Scaling, ::testing::Bool(), twtest::PlacementName);

}  // namespace
