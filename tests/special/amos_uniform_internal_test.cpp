// The large-order routines of the complex Bessel package (and ln Gamma beside them) against
// independent values.
#include <gtest/gtest.h>

#include <cmath>

#include "special/amos/amos.hpp"

namespace {

using namespace tw::amos;

TEST(AmosGamln, MatchesLgamma) {
    // Table points, the shifted series below ZMIN, the plain series above, and past the table.
    for (double z : {1.0, 2.0, 7.0, 100.0, 101.0, 0.1, 0.5, 1.5, 3.25, 6.99, 7.5, 50.5, 100.5, 1234.5, 1e8}) {
        int ierr = -1;
        const double got = dgamln(z, &ierr);
        const double want = std::lgamma(z);
        EXPECT_EQ(ierr, 0) << z;
        // Below ZMIN the shift loses a few units of the log of the product.
        EXPECT_LE(std::fabs(got - want), 2e-15 * std::fmax(1.0, std::fabs(want))) << z;
    }
    for (double z : {0.0, -1.0, -2.5}) {
        int ierr = 0;
        EXPECT_EQ(dgamln(z, &ierr), kD1Mach2) << z;
        EXPECT_EQ(ierr, 1) << z;
    }
}

TEST(AmosChecks, UnderflowFlags) {
    // zuchk: flags a value whose smaller part is under ascle while the larger is within 1/tol of it
    // (so scaling the whole by tol would underflow).
    struct Case {
        double yr, yi;
        int nz;
    } cases[] = {{1e-300, 1e-300, 1}, {1e-300, 3e-290, 1}, {1e-310, 1.0, 0}, {1e-300, 1e-200, 0},
                 {1e-200, 1e-200, 0}, {0.0, 0.0, 0}};
    for (const auto& c : cases) {
        int nz = -1;
        zuchk(c.yr, c.yi, &nz, 1e3 * kD1Mach1 / kTol, kTol);
        EXPECT_EQ(nz, c.nz) << c.yr << " " << c.yi;
    }
    // zs1s2: s1 exp(-2z) formed in place; an underflowing pair is zeroed and flagged.
    double s1r = 2.0, s1i = 1.0, s2r = 3.0, s2i = 0.0;
    int nz = -1, iuf = 0;
    zs1s2(0.5, 0.25, &s1r, &s1i, &s2r, &s2i, &nz, 1e-300, 700.0, &iuf);
    const double er = std::exp(-1.0) * std::cos(-0.5), ei = std::exp(-1.0) * std::sin(-0.5);
    EXPECT_NEAR(s1r, 2.0 * er - 1.0 * ei, 1e-15);
    EXPECT_NEAR(s1i, 2.0 * ei + 1.0 * er, 1e-15);
    EXPECT_EQ(nz, 0);
    EXPECT_EQ(iuf, 1);
    s1r = 1.0, s1i = 0.0, s2r = 1e-310, s2i = 0.0, iuf = 3;
    zs1s2(400.0, 0.0, &s1r, &s1i, &s2r, &s2i, &nz, 1e-300, 700.0, &iuf);
    EXPECT_EQ(nz, 1);
    EXPECT_EQ(iuf, 0);
    EXPECT_EQ(s1r, 0.0);
    EXPECT_EQ(s2r, 0.0);
}

}  // namespace
