// Cosine, sine and spectrum exports through the reference host: which table each caches, in which
// cell or slot, and the failure contract.
#include <gtest/gtest.h>

#include <complex>
#include <cstdint>
#include <cstring>
#include <limits>
#include <vector>

#include "twanlys/fft.h"
#include "twanlys/link.h"
#include "twanlys/transforms.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;

// A work cell or slot points to a holder whose first word is the table; the table's first word
// is its length.
void* HeldTable(void* holder) {
    void* table = nullptr;
    if (holder != nullptr) std::memcpy(&table, holder, sizeof table);
    return table;
}
int32_t HeldSize(void* holder) {
    void* table = HeldTable(holder);
    int32_t n = 0;
    if (table != nullptr) std::memcpy(&n, table, sizeof n);
    return n;
}
void* Slot(void* cell, int i) {
    void* slots[2];
    std::memcpy(slots, cell, sizeof slots);
    return slots[i];
}

std::vector<double> Ramp(int32_t n) {
    std::vector<double> v(static_cast<size_t>(n));
    for (int32_t i = 0; i < n; ++i) v[i] = std::cos(0.7 * i) - 0.02 * i;
    return v;
}

using Trig1D = int32_t (*)(void** x, void** y, int32_t size, void** cell);
using Trig2D = int32_t (*)(void** x, void** y, int32_t rows, int32_t cols, void** c0, void** c1);
using Trig2DIdp = int32_t (*)(void** x, void** y, int32_t rows, int32_t cols, void** cell);

struct OneDCase {
    const char* name;
    Trig1D plain;
    Trig1D idp;
    int32_t (*table)(int32_t n);
};

const OneDCase kOneD[] = {
    {"DCT", DCT_1DH, DCT_1DH_IDP, [](int32_t n) { return n % 2 ? 2 * n : n; }},
    {"InvDCT", [](void** x, void** y, int32_t, void** c) { return InvDCT_1DH(x, y, c); },
     [](void** x, void** y, int32_t, void** c) { return InvDCT_1DH_IDP(x, y, c); },
     [](int32_t n) { return n % 2 ? 2 * n : n; }},
    {"DST", DST_1DH, DST_1DH_IDP, [](int32_t n) { return 2 * n + 2; }},
    {"InvDST", [](void** x, void** y, int32_t, void** c) { return InvDST_1DH(x, y, c); },
     [](void** x, void** y, int32_t, void** c) { return InvDST_1DH_IDP(x, y, c); },
     [](int32_t n) { return 2 * n + 2; }},
};

TEST(TrigCache, WorkCellKeepsTheTableOfTheParityRuleAndReplacesItForANewLength) {
    for (const OneDCase& c : kOneD) {
        const int32_t cleanups = TWRTCleanupCount(2);
        void* cell = nullptr;
        void* holder = nullptr;
        void* table = nullptr;
        for (int32_t n : {8, 8, 9, 1}) {
            twrt::Array1D<double> x(Ramp(n));
            twrt::Array1D<double> y;
            ASSERT_EQ(c.plain(x.h(), y.h(), 0, &cell), 0) << c.name << " n=" << n;
            EXPECT_EQ(y.size(), n);
            EXPECT_EQ(HeldSize(cell), c.table(n)) << c.name << " n=" << n;
            if (holder == nullptr) {
                holder = cell;
                table = HeldTable(cell);
            }
            EXPECT_EQ(cell, holder) << "one holder for the life of the cell";
            if (n == 8) {
                EXPECT_EQ(HeldTable(cell), table) << "the same length reuses the table";
            }
        }
        EXPECT_EQ(TWRTCleanupCount(2), cleanups + 1) << c.name;
        TWRTRunCleanups(2);
    }
}

TEST(TrigCache, TablesComeFromTheSharedList) {
    FftTable* mine = create_qxfft_table(14);
    twrt::Array1D<double> x(Ramp(7));
    twrt::Array1D<double> y;
    void* cell = nullptr;
    ASSERT_EQ(DCT_1DH(x.h(), y.h(), 0, &cell), 0);
    EXPECT_EQ(HeldTable(cell), static_cast<void*>(mine));
    TWRTRunCleanups(2);
    destroy_qxfft_table(mine);
}

TEST(TrigInstanceData, OneDimensionUsesSlotZeroUntilUnreserve) {
    for (const OneDCase& c : kOneD) {
        const int32_t cleanups = TWRTCleanupCount(-1);
        twrt::Array1D<double> x(Ramp(11));
        twrt::Array1D<double> y;
        void* cell = nullptr;
        ASSERT_EQ(c.idp(x.h(), y.h(), 0, &cell), 0) << c.name;
        ASSERT_NE(cell, nullptr);
        EXPECT_EQ(HeldSize(Slot(cell, 0)), c.table(11)) << c.name;
        EXPECT_EQ(Slot(cell, 1), nullptr);
        EXPECT_EQ(TWRTCleanupCount(-1), cleanups) << "instance data registers no cleanup";
        EXPECT_EQ(TransformUnreserveProc(&cell), 0);
        EXPECT_EQ(cell, nullptr);
    }
}

TEST(TrigInstanceData, TwoDimensionsKeepTheRowTableInSlotZeroAndTheColumnTableInSlotOne) {
    const Trig2DIdp forms[] = {
        DCT_2DH_IDP, DST_2DH_IDP,
        [](void** x, void** y, int32_t, int32_t, void** c) { return InvDCT_2DH_IDP(x, y, c); },
        [](void** x, void** y, int32_t, int32_t, void** c) { return InvDST_2DH_IDP(x, y, c); }};
    const bool sine[] = {false, true, false, true};
    for (int i = 0; i < 4; ++i) {
        twrt::Array2D<double> x(5, 6, Ramp(30));
        twrt::Array2D<double> y;
        void* cell = nullptr;
        ASSERT_EQ(forms[i](x.h(), y.h(), 0, 0, &cell), 0);
        EXPECT_EQ(y.rows(), 5);
        EXPECT_EQ(y.cols(), 6);
        EXPECT_EQ(HeldSize(Slot(cell, 0)), sine[i] ? 14 : 6);
        EXPECT_EQ(HeldSize(Slot(cell, 1)), sine[i] ? 12 : 10);
        EXPECT_EQ(TransformUnreserveProc(&cell), 0);
    }
}

TEST(TrigCache, TwoDimensionsKeepOneTablePerCell) {
    const Trig2D forms[] = {DCT_2DH, DST_2DH};
    const int32_t rowTables[] = {8, 18}, colTables[] = {6, 8};
    for (int i = 0; i < 2; ++i) {
        const int32_t cleanups = TWRTCleanupCount(2);
        twrt::Array2D<double> x(2, 3, Ramp(6));
        twrt::Array2D<double> y;
        void* rowCell = nullptr;
        void* colCell = nullptr;
        ASSERT_EQ(forms[i](x.h(), y.h(), 3, 8, &rowCell, &colCell), 0);
        EXPECT_EQ(y.rows(), 3);
        EXPECT_EQ(y.cols(), 8);
        EXPECT_EQ(HeldSize(rowCell), rowTables[i]);
        EXPECT_EQ(HeldSize(colCell), colTables[i]);
        EXPECT_EQ(TWRTCleanupCount(2), cleanups + 2);
        TWRTRunCleanups(2);
    }
}

TEST(TrigFailure, ResizeFailureIsHandedOnAndEmptiesTheOutput) {
    twrt::Array1D<double> x(Ramp(9));
    for (const OneDCase& c : kOneD) {
        twrt::Array1D<double> y(Ramp(4));
        TWRTFailResizeAt(1);
        EXPECT_EQ(c.plain(x.h(), y.h(), 0, nullptr), TWRTResizeFailed) << c.name;
        TWRTFailResizeAt(0);
        EXPECT_EQ(y.size(), 0) << c.name;
    }
    twrt::Array2D<double> m(3, 3, Ramp(9));
    twrt::Array2D<double> out(2, 2, Ramp(4));
    TWRTFailResizeAt(1);
    EXPECT_EQ(DCT_2DH(m.h(), out.h(), 0, 0, nullptr, nullptr), TWRTResizeFailed);
    TWRTFailResizeAt(0);
    EXPECT_EQ(out.rows(), 0);
    EXPECT_EQ(out.cols(), 0);
}

TEST(TrigFailure, ATableLongerThanAnyI32IsOutOfMemoryAndLeavesTheCellEmpty) {
    twrt::Array1D<double> x(Ramp(3));
    twrt::Array1D<double> y(Ramp(3));
    void* cell = nullptr;
    const int32_t big = std::numeric_limits<int32_t>::max();
    EXPECT_EQ(DST_1DH(x.h(), y.h(), big, &cell), OutOfMemoryErr);
    EXPECT_EQ(cell, nullptr);
    EXPECT_EQ(y.size(), 0);
    void* idp = nullptr;
    twrt::Array2D<double> m(2, 2, Ramp(4));
    twrt::Array2D<double> out;
    EXPECT_EQ(DCT_2DH_IDP(m.h(), out.h(), 3, big, &idp), OutOfMemoryErr);
    EXPECT_EQ(out.rows(), 0);
    EXPECT_EQ(TransformUnreserveProc(&idp), 0);
}

TEST(SpectrumCache, PlainAndInstanceDataCellsHoldTheTableOfTheLength) {
    const int32_t cleanups = TWRTCleanupCount(2);
    twrt::Array1D<double> x(Ramp(12));
    void* cell = nullptr;
    ASSERT_EQ(SpectrumH(x.h(), &cell), 0);
    EXPECT_EQ(HeldSize(cell), 12);
    EXPECT_EQ(TWRTCleanupCount(2), cleanups + 1);
    TWRTRunCleanups(2);

    twrt::Array1D<cd> z(std::vector<cd>(7, cd(1, -1)));
    twrt::Array1D<cd> w(std::vector<cd>(7, cd(0, 2)));
    twrt::Array1D<cd> out;
    void* idp = nullptr;
    ASSERT_EQ(CxCrossSpectrumH_IDP(z.h(), w.h(), out.h(), &idp), 0);
    EXPECT_EQ(HeldSize(Slot(idp, 0)), 7);
    // A constant: conj(7 (1 - i)) 7 (2i) / 49 at bin 0, nothing elsewhere.
    EXPECT_NEAR(out[0].real(), -2, 1e-15);
    EXPECT_NEAR(out[0].imag(), 2, 1e-15);
    for (int32_t k = 1; k < 7; ++k) EXPECT_LT(std::abs(out[k]), 1e-15);
    EXPECT_EQ(TWRTCleanupCount(2), cleanups);
    EXPECT_EQ(TransformUnreserveProc(&idp), 0);
}

TEST(SpectrumFailure, ResizeFailureIsOutOfMemoryForComplexDataAndTheHostsStatusForCrossOfReals) {
    twrt::Array1D<double> r(Ramp(6));
    twrt::Array1D<cd> c(std::vector<cd>(6, cd(1, 2)));
    struct Case {
        const char* name;
        int32_t expected;
        int32_t (*call)(void** real, void** complex, void** out);
    };
    const Case cases[] = {
        {"CxSpectrumH", OutOfMemoryErr,
         [](void**, void** a, void** o) { return CxSpectrumH(a, o, nullptr); }},
        {"CxCrossSpectrumH", OutOfMemoryErr,
         [](void**, void** a, void** o) { return CxCrossSpectrumH(a, a, o, nullptr); }},
        {"CrossSpectrumH", TWRTResizeFailed,
         [](void** a, void**, void** o) { return CrossSpectrumH(a, a, o, nullptr); }},
    };
    for (const Case& k : cases) {
        twrt::Array1D<cd> out(std::vector<cd>(3, cd(1, 1)));
        TWRTFailResizeAt(1);
        EXPECT_EQ(k.call(r.h(), c.h(), out.h()), k.expected) << k.name;
        TWRTFailResizeAt(0);
        EXPECT_EQ(out.size(), 0) << k.name;
    }
}

}  // namespace
