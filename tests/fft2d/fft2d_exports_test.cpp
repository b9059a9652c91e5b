// 2-D FFT frames: which table each cell and instance-data slot holds, the status order, and y
// emptied on failure. The numerics are compared with NumPy in tests/reference/test_fft2d.py.
#include <gtest/gtest.h>

#include <complex>
#include <cstring>
#include <functional>
#include <vector>

#include "twanlys/fft.h"
#include "twanlys/link.h"
#include "twrt.hpp"

namespace {

using cd = std::complex<double>;

// A cell or slot points to a holder whose first word is the table; the table's first word its size.
int32_t HeldSize(void* holder) {
    void* table = nullptr;
    std::memcpy(&table, holder, sizeof table);
    int32_t n = 0;
    std::memcpy(&n, table, sizeof n);
    return n;
}

TEST(Fft2DCells, FirstHoldsTheRowLengthSecondTheColumnLength) {
    twrt::Array2D<double> x(3, 5, std::vector<double>(15, 1.0));
    twrt::Array2D<cd> cx(3, 5, std::vector<cd>(15, cd(1, 2)));
    twrt::Array2D<cd> y;
    twrt::Array2D<double> ry;
    using Run = std::function<int32_t(void**, void**)>;
    const Run runs[] = {
        [&](void** a, void** b) { return ReFFT2D_H(x.h(), 0, 0, 6, 10, 0, y.h(), a, b); },
        [&](void** a, void** b) { return CxFFT2D_H(cx.h(), 1, 2, 6, 10, 1, y.h(), a, b); },
        [&](void** a, void**) { return ReFFT2D_H_IDP(x.h(), 0, 0, 6, 10, 0, y.h(), a); },
        [&](void** a, void**) { return CxFFT2D_H_IDP(cx.h(), 0, 0, 6, 10, 1, y.h(), a); },
    };
    for (int i = 0; i < 4; ++i) {
        void* c0 = nullptr;
        void* c1 = nullptr;
        const bool idp = i >= 2;
        ASSERT_EQ(runs[i](&c0, idp ? &c0 : &c1), 0) << i;
        EXPECT_EQ(y.rows(), 6);
        EXPECT_EQ(y.cols(), 10);
        void* holders[2] = {c0, c1};
        if (idp) std::memcpy(holders, c0, sizeof holders);
        EXPECT_EQ(HeldSize(holders[0]), 10) << i;
        EXPECT_EQ(HeldSize(holders[1]), 6) << i;
        if (idp) {
            EXPECT_EQ(TransformUnreserveProc(&c0), 0);
            EXPECT_EQ(c0, nullptr);
        }
    }
    // The inverses take their lengths from x: 4 rows of 7.
    twrt::Array2D<cd> spectrum(4, 7, std::vector<cd>(28, cd(0.5, -1)));
    void* c0 = nullptr;
    void* c1 = nullptr;
    ASSERT_EQ(ReInvFFT2D_H(spectrum.h(), 0, ry.h(), &c0, &c1), 0);
    EXPECT_EQ(HeldSize(c0), 7);
    EXPECT_EQ(HeldSize(c1), 4);
    void* cell = nullptr;
    ASSERT_EQ(CxInvFFT2D_H_IDP(spectrum.h(), 1, y.h(), &cell), 0);
    void* slots[2];
    std::memcpy(slots, cell, sizeof slots);
    EXPECT_EQ(HeldSize(slots[0]), 7);
    EXPECT_EQ(HeldSize(slots[1]), 4);
    EXPECT_EQ(TransformUnreserveProc(&cell), 0);
    TWRTRunCleanups(-1);  // the work cells' tables go with their call sites
}

TEST(Fft2DFrames, StatusesInTheirOrderEmptyY) {
    twrt::Array2D<double> x(4, 3, std::vector<double>(12, 2.0));
    twrt::Array2D<double> none(0, 3);
    struct Row {
        const twrt::Array2D<double>* x;
        int32_t rowStart, colStart, rows, cols, status;
    };
    const Row rows[] = {
        {&none, 9, 9, 0, 0, -20003},                             // empty first
        {&x, 4, 0, 0, 2, -20017},                                // start past the end before the size
        {&x, 0, 3, 2, 2, -20017},    {&x, -1, 0, 2, 2, -20017},  // negative starts are refused by the core
        {&x, 0, -2, 2, 2, -20017},   {&x, 3, 2, 0, 2, -20008},  {&x, 3, 2, 2, -1, -20008},
    };
    for (const Row& r : rows) {
        twrt::Array2D<cd> y(2, 2, std::vector<cd>(4, cd(1, 1)));
        EXPECT_EQ(ReFFT2D_H(r.x->h(), r.rowStart, r.colStart, r.rows, r.cols, 0, y.h(), nullptr, nullptr),
                  r.status);
        EXPECT_EQ(y.rows(), 0);
        EXPECT_EQ(y.cols(), 0);
    }
    twrt::Array2D<cd> emptySpectrum(3, 0);
    twrt::Array2D<double> ry(2, 2, std::vector<double>(4, 1.0));
    void* cell = nullptr;
    EXPECT_EQ(ReInvFFT2D_H_IDP(emptySpectrum.h(), 0, ry.h(), &cell), -20003);
    EXPECT_EQ(ry.rows() + ry.cols(), 0);
    EXPECT_EQ(cell, nullptr);
}

}  // namespace
