// Smoothing exports: check orders and statuses, the outputs a failure must or must not touch, and
// the padding at the ends of the median, in both block placements (the numerics against SciPy and
// exact rationals are in tests/reference/test_smoothing.py).
#include <gtest/gtest.h>

#include <limits>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/smoothing.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using twrt::Array2D;
using V = std::vector<double>;
const double kNaNIn = std::numeric_limits<double>::quiet_NaN();

class Smoothing : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(Smoothing, SavitzkyGolayStatusesInCheckOrder) {
    struct Case {
        int32_t order, frame;
        V weights;
        int32_t n, status;
    };
    const V w5{1, -2, 0, 3, 1};
    const Case cases[] = {
        {0, 4, {}, 9, TermsBelowOneErr},  // before the frame tests
        {-1, 5, {}, 9, TermsBelowOneErr},
        {4, 4, {}, 9, PolyOrderErr},  // before the parity test
        {2, 2, {}, 0, PolyOrderErr},
        {1, 4, {}, 9, EvenTapsErr},
        {2, 5, {1, 1}, 9, EqSamplesErr},  // before the length test
        {2, 5, {}, 4, SizeMismatchErr},
        {2, 5, {}, 0, SizeMismatchErr},
        {3, 5, {1, 0, 2, 0, 1}, 9, SingularMatrixErr},  // fewer non-zero weights than coefficients
        {2, 5, {0, 1, 0, 0, 1}, 9, SingularMatrixErr},
        {2, 5, {1, 1, kNaNIn, 1, 1}, 9, NanInfErr},
        {3, 5, w5, 5, 0},  // as many non-zero weights as coefficients
        {4, 5, {}, 5, 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(testing::Message() << c.order << " " << c.frame << " " << c.n);
        // The design has no signal to be too short.
        const int32_t design = c.status == SizeMismatchErr ? 0 : c.status;
        Array1D<double> w(c.weights), x(V(static_cast<size_t>(c.n), 1.0)), y(V{5});
        Array2D<double> h(1, 1, {5}), k(1, 1, {5}), kept(1, 1, {7});
        EXPECT_EQ(SavitzkyGolayCoefH(c.order, c.frame, w.h(), 1, h.h(), k.h()), design);
        const V hWith = h.vec();
        EXPECT_EQ(SavitzkyGolayCoefH(c.order, c.frame, w.h(), 0, h.h(), kept.h()), design);
        EXPECT_EQ(h.vec(), hWith);
        // Without derivatives K is no output, on success or failure.
        EXPECT_EQ(kept.rows() * kept.cols(), 1);
        EXPECT_EQ(kept.at(0, 0), 7);
        const bool designed = design == 0;
        EXPECT_EQ(h.rows(), designed ? c.frame : 0);
        EXPECT_EQ(h.cols(), designed ? c.frame : 0);
        EXPECT_EQ(k.rows(), designed ? c.order + 1 : 0);
        EXPECT_EQ(k.cols(), designed ? c.frame : 0);
        EXPECT_EQ(SavitzkyGolayFiltH(x.h(), c.order, c.frame, w.h(), y.h()), c.status);
        EXPECT_EQ(y.size(), c.status == 0 ? c.n : 0);
    }
}

TEST_P(Smoothing, MedianStatusesAndWindows) {
    struct Case {
        V in;
        int32_t left, right, status;
        V out;
    };
    const V ones(5, 1.0);
    const Case cases[] = {
        {ones, 1, 1, 0, ones},               // window 0, 1, 1 at the start
        {ones, 2, -1, 0, ones},              // 0, 0, 1, 1, 1
        {ones, 1, 0, 0, {0.5, 1, 1, 1, 1}},  // even window: mean of the middle pair
        {ones, 3, 0, 0, {0, 0.5, 1, 1, 1}},
        {ones, 0, 3, 0, {1, 1, 1, 0.5, 0}},
        {{3, -1, 2}, 0, 0, 0, {3, -1, 2}},
        {{3, -1, 2}, 40, 2, 0, {0, 0, 0}},  // mostly padding
        {{}, 2, 7, 0, {}},                  // empty: nothing to do
        {{}, -1, 0, NegativeLengthErr, {}},
        {ones, -2, 1, NegativeLengthErr, {}},
        {ones, 1, 5, SizeMismatchErr, {}},
        {ones, 5, -1, SizeMismatchErr, {}},  // right follows left
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(testing::Message() << c.left << " " << c.right << " " << c.in.size());
        Array1D<double> x(c.in);
        EXPECT_EQ(MedianFilter81_H(x.h(), c.left, c.right), c.status);
        EXPECT_EQ(x.vec(), c.out);
        if (c.right == c.left || c.right < 0) {
            Array1D<double> x2(c.in);
            int32_t half = c.left, status = 1;
            EXPECT_EQ(MedianFilterCIN(x2.h(), &half, &status), 0);
            EXPECT_EQ(status, c.status);
            EXPECT_EQ(x2.vec(), c.out);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Placements, Smoothing, ::testing::Bool(), twtest::PlacementName);

}  // namespace
