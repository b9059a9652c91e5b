// Hartley, Hilbert and Zak exports through the reference host: x's fold reaches the host's block
// under both placements, and the table each caches sits in its cell.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <cstdint>
#include <cstring>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/link.h"
#include "twanlys/transforms.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;

std::vector<double> Ramp(int32_t n) {
    std::vector<double> v(static_cast<size_t>(n));
    for (int32_t i = 0; i < n; ++i) v[i] = std::cos(0.7 * i) + 0.1 * i;
    return v;
}

// The length of the table a work cell or instance-data slot holds (holder -> table -> size).
int32_t HeldSize(void* holder) {
    void* table = nullptr;
    int32_t n = 0;
    if (holder != nullptr) std::memcpy(&table, holder, sizeof table);
    if (table != nullptr) std::memcpy(&n, table, sizeof n);
    return n;
}

class Placements : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement{GetParam()};
};

// x = 0..9 with M = N = 2 (T = 4): one pass adds x[2..5] as they stood before it, the rest adds
// x[6..7]. A pass that read its own writes would give x[1] = 9.
TEST_P(Placements, ZakFoldsXInPlaceFromIndexN) {
    const std::vector<double> folded = {8, 11, 6, 8, 4, 5, 6, 7, 8, 9};
    twrt::Array1D<double> x({0, 1, 2, 3, 4, 5, 6, 7, 8, 9});
    twrt::Array1D<cd> y;
    ASSERT_EQ(ReDZTH(x.h(), 2, 2, 0, 2, y.h(), nullptr), 0);
    EXPECT_EQ(x.vec(), folded);
    // M = 2, N = 2: y[q] = H0[q] + exp(-i pi q / 2) H1[q] with H0 = DFT(8, 6), H1 = DFT(11, 8).
    EXPECT_EQ(y[0], cd(14 + 19, 0));
    EXPECT_NEAR(std::abs(y[1] - (cd(2, 0) + cd(0, -1) * cd(3, 0))), 0, 1e-15);
    twrt::Array1D<cd> z({0, 1, 2, 3, 4, 5, 6, 7, 8, 9});
    ASSERT_EQ(CxDZTH(z.h(), 2, 2, 0, 2, y.h(), nullptr), 0);
    for (int32_t i = 0; i < 10; ++i) EXPECT_EQ(z[i], cd(folded[i], 0));
}

INSTANTIATE_TEST_SUITE_P(Both, Placements, ::testing::Bool(), twtest::PlacementName);

TEST(HartleyCells, WorkCellsKeepTheTableOfTheLengthAndInstanceDataUsesSlotZero) {
    struct Case {
        const char* name;
        int32_t (*plain)(void** x, void** cell);
        int32_t (*idp)(void** x, void** cell);
    };
    const Case cases[] = {{"FHTH", FHTH, FHTH_IDP},
                          {"InvFHTH", InvFHTH, InvFHTH_IDP},
                          {"Hilbert", FastHilbertTransformH, FastHilbertTransformH_IDP},
                          {"InvHilbert", InvFastHilbertTransformH, InvFastHilbertTransformH_IDP}};
    for (const Case& c : cases) {
        void* cell = nullptr;
        for (int32_t n : {9, 9, 16}) {
            twrt::Array1D<double> x(Ramp(n));
            ASSERT_EQ(c.plain(x.h(), &cell), 0) << c.name;
            EXPECT_EQ(HeldSize(cell), n) << c.name;
        }
        TWRTRunCleanups(2);
        void* idp = nullptr;
        twrt::Array1D<double> x(Ramp(7));
        ASSERT_EQ(c.idp(x.h(), &idp), 0) << c.name;
        void* slots[2];
        std::memcpy(slots, idp, sizeof slots);
        EXPECT_EQ(HeldSize(slots[0]), 7) << c.name;
        EXPECT_EQ(slots[1], nullptr);
        EXPECT_EQ(TransformUnreserveProc(&idp), 0);
    }
    // The Zak transform caches the table of its DFT length N, not of x.
    void* cell = nullptr;
    twrt::Array1D<double> x(Ramp(30));
    twrt::Array1D<cd> y;
    ASSERT_EQ(ReDZTH(x.h(), 3, 5, 1, 4, y.h(), &cell), 0);
    EXPECT_EQ(HeldSize(cell), 5);
    TWRTRunCleanups(2);
}

}  // namespace
