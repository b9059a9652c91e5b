// The FFT exports through the reference host: caching of tables in work cells and instance data,
// and the failure contract.
#include <gtest/gtest.h>

#include <sys/resource.h>

#include <complex>
#include <cstring>
#include <vector>

#include "twanlys/fft.h"
#include "twanlys/link.h"
#include "twrt.hpp"

namespace twtest {
bool WorkspaceMode();
}

namespace {

using cd = std::complex<double>;

// A work cell points to a holder whose first word is the table; the table's first word its size.
void* HeldTable(void* cell) {
    void* table = nullptr;
    if (cell != nullptr) std::memcpy(&table, cell, sizeof table);
    return table;
}
int32_t TableSize(void* table) {
    int32_t n = 0;
    std::memcpy(&n, table, sizeof n);
    return n;
}

std::vector<double> Ramp(int32_t n) {
    std::vector<double> v(static_cast<size_t>(n));
    for (int32_t i = 0; i < n; ++i) v[i] = std::sin(0.3 * i) + 0.01 * i;
    return v;
}

TEST(FftCache, SecondCallReusesTheTableAndANewSizeReplacesIt) {
    const int32_t cleanups = TWRTCleanupCount(2);
    twrt::Array1D<double> x(Ramp(1000));
    twrt::Array1D<cd> y;
    void* cell = nullptr;
    ASSERT_EQ(ReQXFFTH80(x.h(), y.h(), &cell, 0, 1000, 0), 0);
    ASSERT_NE(cell, nullptr);
    void* table = HeldTable(cell);
    EXPECT_EQ(TableSize(table), 1000);
    EXPECT_EQ(TWRTCleanupCount(2), cleanups + 1);
    const std::vector<cd> first = y.vec();

    const int64_t allocs = TWRTAllocCount(), resizes = TWRTResizeCount();
    ASSERT_EQ(ReQXFFTH80(x.h(), y.h(), &cell, 0, 1000, 0), 0);
    // The only host allocation is the resize of y (the suites' host moves a block on every resize).
    EXPECT_EQ(TWRTAllocCount() - allocs, TWRTResizeCount() - resizes);
    EXPECT_EQ(HeldTable(cell), table);
    EXPECT_EQ(TWRTCleanupCount(2), cleanups + 1);
    EXPECT_EQ(y.vec(), first);

    void* holder = cell;
    ASSERT_EQ(ReQXFFTH80(x.h(), y.h(), &cell, 0, 512, 0), 0);
    EXPECT_EQ(cell, holder);
    EXPECT_EQ(TableSize(HeldTable(cell)), 512);
    EXPECT_EQ(TWRTCleanupCount(2), cleanups + 1);
    EXPECT_EQ(y.size(), 512);
    EXPECT_EQ(TWRTRunCleanups(2), cleanups + 1);
}

long MinorFaults() {
    rusage u{};
    getrusage(RUSAGE_SELF, &u);
    return u.ru_minflt;
}

// With a host that resizes in place, a repeated call of one size finds everything where the last
// call left it: no host allocation and (but for a handful) no page mapped and faulted afresh.
TEST(FftCache, RepeatedCallsOfOneSizeTouchNoFreshPages) {
    twrt::ResizeMode keep(0);
    twrt::Placement aligned(true);
    constexpr int32_t n = 48000;
    twrt::Array1D<double> x(Ramp(n));
    twrt::Array1D<cd> y;
    struct Case {
        int32_t start, size, shift;
    };
    for (const Case c : {Case{0, n, 0}, Case{0, n, 1}, Case{100, n + 4000, 1}}) {
        void* cell = nullptr;
        ASSERT_EQ(ReQXFFTH80(x.h(), y.h(), &cell, c.start, c.size, c.shift), 0);
        const std::vector<cd> first = y.vec();
        const int64_t allocs = TWRTAllocCount();
        const long faults = MinorFaults();
        for (int i = 0; i < 8; ++i) ASSERT_EQ(ReQXFFTH80(x.h(), y.h(), &cell, c.start, c.size, c.shift), 0);
        EXPECT_LT(MinorFaults() - faults, 16) << c.size << " " << c.shift;
        EXPECT_EQ(TWRTAllocCount(), allocs);
        EXPECT_EQ(y.vec(), first);
        TWRTRunCleanups(2);
    }
}

TEST(FftCache, TablesAreSharedBetweenCallSites) {
    FftTable* mine = create_qxfft_table(720);
    twrt::Array1D<cd> x(std::vector<cd>(720, cd(1, 2)));
    twrt::Array1D<cd> y;
    void* cell = nullptr;
    ASSERT_EQ(CxQXFFTH(x.h(), y.h(), &cell), 0);
    EXPECT_EQ(HeldTable(cell), static_cast<void*>(mine));
    EXPECT_EQ(y[0], cd(720, 1440));
    TWRTRunCleanups(2);
    destroy_qxfft_table(mine);
}

TEST(FftInstanceData, RecordLivesUntilUnreserve) {
    const int32_t cleanups = TWRTCleanupCount(-1);
    twrt::Array1D<double> x(Ramp(97));
    twrt::Array1D<cd> y;
    twrt::Array1D<double> z;
    void* cell = nullptr;
    ASSERT_EQ(ReQXFFTH80_IDP(x.h(), y.h(), &cell, 0, 97, 0), 0);
    ASSERT_NE(cell, nullptr);
    void* slots[2];
    std::memcpy(slots, cell, sizeof slots);
    ASSERT_NE(slots[0], nullptr);
    EXPECT_EQ(slots[1], nullptr);
    EXPECT_EQ(TableSize(HeldTable(slots[0])), 97);
    ASSERT_EQ(InvReQXFFTH80_IDP(y.h(), z.h(), &cell, 0), 0);
    void* again[2];
    std::memcpy(again, cell, sizeof again);
    EXPECT_EQ(again[0], slots[0]);
    for (int32_t i = 0; i < 97; ++i) EXPECT_NEAR(z[i], x[i], 1e-14);
    EXPECT_EQ(TWRTCleanupCount(-1), cleanups);
    EXPECT_EQ(TransformUnreserveProc(&cell), 0);
    EXPECT_EQ(cell, nullptr);
    EXPECT_EQ(TransformUnreserveProc(&cell), 0);
}

TEST(FftInstanceData, EveryTwinRoundTrips) {
    twrt::Array1D<double> x(Ramp(60));
    twrt::Array1D<double> packed, back;
    twrt::Array1D<cd> spectrum, cx;
    void* cell = nullptr;
    ASSERT_EQ(ReQXFFTHCH_IDP(x.h(), packed.h(), &cell), 0);
    ASSERT_EQ(InvReQXFFTHCH_IDP(packed.h(), back.h(), &cell), 0);
    for (int32_t i = 0; i < 60; ++i) EXPECT_NEAR(back[i], x[i], 1e-14);
    ASSERT_EQ(ReQXFFTH80_IDP(x.h(), spectrum.h(), &cell, 0, 60, 1), 0);
    ASSERT_EQ(InvCxQXFFTH80_IDP(spectrum.h(), cx.h(), &cell, 1), 0);
    ASSERT_EQ(CxQXFFTH80_IDP(cx.h(), spectrum.h(), &cell, 0, 60, 0), 0);
    ASSERT_EQ(InvCxQXFFTH80_IDP(spectrum.h(), cx.h(), &cell, 0), 0);
    for (int32_t i = 0; i < 60; ++i) {
        EXPECT_NEAR(cx[i].real(), x[i], 1e-14);
        EXPECT_NEAR(cx[i].imag(), 0.0, 1e-14);
    }
    EXPECT_EQ(TransformUnreserveProc(&cell), 0);
}

TEST(FftFailure, ResizeFailureIsHandedOnAndEmptiesTheOutput) {
    twrt::Array1D<double> x(Ramp(16));
    struct Case {
        const char* name;
        int32_t (*call)(void**, void**, void**);
    };
    const Case cases[] = {
        {"ReQXFFTH", [](void** a, void** b, void** c) { return ReQXFFTH(a, b, c); }},
        {"ReQXFFTHCH", [](void** a, void** b, void** c) { return ReQXFFTHCH(a, b, c); }},
        {"InvReQXFFTHCH", [](void** a, void** b, void** c) { return InvReQXFFTHCH(a, b, c); }},
    };
    for (const Case& c : cases) {
        twrt::Array1D<double> in(Ramp(16));
        twrt::Array1D<cd> y(std::vector<cd>(5, cd(1, 1)));
        void* cell = nullptr;
        TWRTFailResizeAt(1);
        EXPECT_EQ(c.call(in.h(), y.h(), &cell), TWRTResizeFailed) << c.name;
        TWRTFailResizeAt(0);
        EXPECT_EQ(y.size(), 0) << c.name;
    }
    TWRTRunCleanups(2);
}

}  // namespace
