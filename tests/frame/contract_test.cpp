// The failure contract and the resize rules, observed through exports as a host sees them.
#include <gtest/gtest.h>

#include "common/helpers.hpp"
#include "twanlys/stats.h"
#include "twanlys/workspace.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;

class Contract : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

TEST_P(Contract, OutputShrinksToExactlyTheNewSize) {
    const Array1D<double> x{1, 2, 3, 4, 5};
    Array1D<int32_t> counts(100);
    Array1D<double> centres(100);
    int32_t bins = 4, status = -1;
    histgran_head(x.h(), &bins, counts.h(), centres.h(), &status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(counts.size(), 4);
    EXPECT_EQ(centres.size(), 4);
    // Unit-wide bins from 1; the maximum 5 indexes past the end and joins the last bin.
    EXPECT_EQ(counts.vec(), (std::vector<int32_t>{1, 1, 1, 2}));
}

TEST_P(Contract, ModeHandsOnTheHostsOwnResizeStatus) {
    const Array1D<double> x{1, 1, 2};
    Array1D<double> modes{5};
    TWRTFailResizeAt(1);
    const int32_t status = ModeH(x.h(), 0, modes.h());
    TWRTFailResizeAt(0);
    EXPECT_EQ(status, TWRTResizeFailed);
    EXPECT_EQ(modes.size(), 0);
}

TEST_P(Contract, WarningKeepsTheResult) {
    const Array1D<double> x{1, 2, 3, 4, 5}, y{1, 2, 4};
    double mse = 0;
    int32_t status = 0;
    MSE_head(x.h(), y.h(), &mse, &status);
    EXPECT_EQ(status, LengthsDifferWarn);
    EXPECT_DOUBLE_EQ(mse, 1.0 / 3.0);
}

TEST_P(Contract, CallsDoNotAllocateBeyondTheirOutputs) {
    // A reduction reads in place when the data are aligned and copies them otherwise; either
    // way it leaves the host's allocation count alone.
    const Array1D<double> x{1, 2, 3};
    double mean;
    int32_t status;
    const int64_t before = TWRTAllocCount();
    Mean_head(x.h(), &mean, &status);
    EXPECT_EQ(TWRTAllocCount(), before);
    EXPECT_EQ(mean, 2.0);
}

INSTANTIATE_TEST_SUITE_P(Placements, Contract, ::testing::Values(false, true), twtest::PlacementName);

TEST(ErrorClusterStyle, IncomingErrorMakesTheCallANoOp) {
    ErrorCluster e{};
    e.status = 1;
    e.code = -1234;
    InitializeAnalysisWorkspaceH(1024, &e);
    EXPECT_EQ(int32_t{e.code}, -1234);
    EXPECT_EQ(e.status, 1);
}

}  // namespace
