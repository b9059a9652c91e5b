// The resampler records are packed and may sit at any address: the same stream with the records
// at every offset of an 8-byte word gives the same samples and the same state.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <vector>

#include "twanlys/signal.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using V = std::vector<double>;

TEST(Records, ConstantRatioRecordsAtAnyAddress) {
    V cells(25), first;
    for (int i = 0; i < 25; ++i) cells[i] = std::pow(std::cos((i - 12) * 3.14159265358979 / 26.0), 2);
    const Array1D<double> table(cells);
    double firstFrac = -1;
    for (size_t offset = 0; offset < 8; ++offset) {
        alignas(16) unsigned char stateBytes[96], settingsBytes[96];
        Array1D<double> buffer, coefs;
        ResampleState init{};
        init.buffer = buffer.h();
        init.coefs = coefs.h();
        const ResampleSettings settings{0.625, 0, 1.5, table.h(), 4};
        std::memcpy(stateBytes + offset, &init, sizeof init);
        std::memcpy(settingsBytes + offset + 1, &settings, sizeof settings);
        auto* state = reinterpret_cast<ResampleState*>(stateBytes + offset);
        const auto* s = reinterpret_cast<const ResampleSettings*>(settingsBytes + offset + 1);
        V all;
        for (int call = 0; call < 3; ++call) {
            V x(17 + call);
            for (size_t i = 0; i < x.size(); ++i) x[i] = std::sin(0.3 * i) + 0.1 * call;
            Array1D<double> y;
            int32_t produced = -1;
            ASSERT_EQ(Resample_Const(Array1D<double>(x).h(), state, s, call == 0, y.h(), &produced, 1), 0);
            for (int32_t i = 0; i < produced; ++i) all.push_back(y[i]);
        }
        ResampleState after;
        std::memcpy(&after, stateBytes + offset, sizeof after);
        EXPECT_EQ(after.ratio, 0.625);
        EXPECT_EQ(buffer.size(), coefs.size());  // both hold the capacity made on the reset
        EXPECT_LE(after.count, buffer.size());
        if (offset == 0) first = all, firstFrac = after.frac;
        EXPECT_EQ(all, first) << "offset " << offset;
        EXPECT_EQ(after.frac, firstFrac);
    }
    EXPECT_GT(first.size(), 30u);
}

}  // namespace
