// The resampler records are packed and may sit at any address: the same call with the records at
// every offset of an 8-byte word must give the same samples and leave the same state.
#include <gtest/gtest.h>

#include <cmath>
#include <cstddef>
#include <cstring>
#include <vector>

#include "twanlys/signal.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using V = std::vector<double>;

// A symmetric table at oversample 4 spanning three input samples each side.
V Table() {
    V t(25);
    for (int i = 0; i < 25; ++i) t[i] = std::pow(std::cos((i - 12) * 3.14159265358979 / 26.0), 2);
    return t;
}

V Signal(int n) {
    V x(n);
    for (int i = 0; i < n; ++i) x[i] = std::sin(0.3 * i) + 0.1 * i;
    return x;
}

template <class R>
R* At(unsigned char* bytes, size_t offset, const R& value) {
    std::memcpy(bytes + offset, &value, sizeof value);
    return reinterpret_cast<R*>(bytes + offset);
}

template <class R>
R Read(const R* p) {
    R r;
    std::memcpy(&r, p, sizeof r);
    return r;
}

TEST(Records, ConstantRatioAtAnyAddress) {
    const Array1D<double> table(Table());
    std::vector<V> outputs;
    std::vector<double> fracs;
    for (size_t offset = 0; offset < 8; ++offset) {
        alignas(16) unsigned char sbytes[96], tbytes[96];
        Array1D<double> buffer, coefs;
        ResampleState init{};
        init.buffer = buffer.h();
        init.coefs = coefs.h();
        ResampleState* state = At(sbytes, offset, init);
        const ResampleSettings* settings =
            At(tbytes, offset + 1, ResampleSettings{0.625, 0, 1.5, table.h(), 4});
        V all;
        for (int call = 0; call < 3; ++call) {
            const Array1D<double> x(Signal(17 + call));
            Array1D<double> y;
            int32_t produced = -1;
            ASSERT_EQ(Resample_Const(x.h(), state, settings, call == 0, y.h(), &produced, 1), 0) << offset;
            ASSERT_LE(produced, y.size());
            for (int32_t i = 0; i < produced; ++i) all.push_back(y[i]);
        }
        const ResampleState s = Read(state);
        EXPECT_EQ(s.ratio, 0.625);
        // Buffer and coefficients hold the capacity made on the reset; count of it is live.
        EXPECT_EQ(buffer.size(), coefs.size());
        EXPECT_LE(s.count, buffer.size());
        fracs.push_back(s.frac);
        outputs.push_back(all);
    }
    for (size_t i = 1; i < outputs.size(); ++i) {
        EXPECT_EQ(outputs[i], outputs[0]) << "offset " << i;
        EXPECT_EQ(fracs[i], fracs[0]);
    }
    EXPECT_GT(outputs[0].size(), 30u);
}

TEST(Records, VariableSettingsAtAnyAddress) {
    const Array1D<double> table(Table());
    std::vector<V> outputs;
    for (size_t offset = 0; offset < 8; ++offset) {
        alignas(16) unsigned char bytes[64];
        const VariableSettings* settings = At(bytes, offset, VariableSettings{0, 1, table.h(), 4});
        const Array1D<double> x(Signal(30));
        Array1D<double> times(V{0.5, 1.25, 3.0, 6.5, 7.0, 40.0});
        double last = 0;
        int32_t done = -1, consumed = -1;
        ASSERT_EQ(Resample_Variable(x.h(), times.h(), settings, &last, &done, &consumed), 0);
        ASSERT_EQ(done, 5);  // the last instant lies beyond the block
        EXPECT_EQ(times[5], 40.0 - consumed);
        EXPECT_EQ(last, 7.0 - consumed);
        outputs.push_back(times.vec());
    }
    for (size_t i = 1; i < outputs.size(); ++i) EXPECT_EQ(outputs[i], outputs[0]) << "offset " << i;
}

}  // namespace
