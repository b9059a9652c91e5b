// The special-function frame's own pieces: polynomial and Chebyshev evaluation, the NaN test by bit
// pattern and the complex routines' status translation.
#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <cstdint>

#include "special/special_frame.hpp"

namespace {

using namespace tw;

TEST(SpecialFrame, EvalPolyIsHornerHighestPowerFirst) {
    const double t[] = {2.0, -3.0, 5.0};  // 2x^2 - 3x + 5
    EXPECT_EQ(EvalPoly(1.5, t, 2), 5.0);
    EXPECT_EQ(EvalPoly(-2.0, t, 2), 19.0);
    EXPECT_EQ(EvalPoly(7.0, t, 0), 2.0);
    EXPECT_TRUE(std::isnan(EvalPoly(1.0, t, -1)));
}

TEST(SpecialFrame, EvalPolyMonicHasAnUnstoredLeadingOne) {
    const double t[] = {-3.0, 5.0};  // x^2 - 3x + 5
    EXPECT_EQ(EvalPolyMonic(2.0, t, 2), 3.0);
    EXPECT_EQ(EvalPolyMonic(2.0, t, 1), -1.0);
    EXPECT_EQ(EvalPolyMonic(2.0, t, 0), 1.0);
    EXPECT_TRUE(std::isnan(EvalPolyMonic(2.0, t, -2)));
}

TEST(SpecialFrame, EvalChebyshevSumsInHalfArgument) {
    // 4/2 T0(y) + 2 T1(y) + 1 T2(y) at y = x/2, with T2(y) = 2y^2 - 1.
    const double t[] = {1.0, 2.0, 4.0};
    for (const double x : {-3.0, -1.0, 0.0, 1.0, 3.0}) {
        const double y = x / 2;
        EXPECT_DOUBLE_EQ(EvalChebyshev(x, t, 3), 2.0 + 2.0 * y + (2.0 * y * y - 1.0)) << x;
    }
    EXPECT_EQ(EvalChebyshev(0.3, t, 1), 0.5);
    EXPECT_TRUE(std::isnan(EvalChebyshev(0.3, t, 0)));
}

TEST(SpecialFrame, NaNTestReadsTheBitPattern) {
    for (const uint64_t bits :
         {0x7FF8000000000000ull, 0xFFF8000000000000ull, 0x7FF0000000000001ull, 0xFFFFFFFFFFFFFFFFull}) {
        EXPECT_TRUE(IsNaN(std::bit_cast<double>(bits))) << std::hex << bits;
        EXPECT_FALSE(IsFinite(std::bit_cast<double>(bits)));
    }
    for (const double x : {0.0, -0.0, 1e-310, 1.7976931348623157e308, kInf, -kInf})
        EXPECT_FALSE(IsNaN(x)) << x;
    EXPECT_TRUE(IsPosInf(kInf));
    EXPECT_TRUE(IsNegInf(-kInf));
    EXPECT_FALSE(IsPosInf(1.7976931348623157e308));
}

TEST(SpecialFrame, AmosErrorFlagsBecomeStatuses) {
    struct Row {
        int32_t ierr;
        Status status;
    };
    const Row rows[] = {
        {0, 0},
        {1, SpecialFunctionInputErr},
        {2, DomainSingularityErr},
        {3, MatrixFunctionAccuracyWarn},
        {4, SpecialFunctionDomainErr},
        {5, NoConvergenceErr},
        {6, InternalErr},
        {-1, InternalErr},
        {1 << 30, InternalErr},
    };
    for (const Row& r : rows) EXPECT_EQ(AmosStatus(r.ierr), r.status) << r.ierr;
}

TEST(SpecialFrame, SelectorOneAloneMeansComplete) {
    EXPECT_TRUE(SelectsComplete(1));
    for (const int32_t s : {0, 2, -1, 1 << 30}) EXPECT_FALSE(SelectsComplete(s)) << s;
}

}  // namespace
