// Statuses of the multitone export and the zeroed results of its failures.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/measure.h"
#include "twrt.hpp"

namespace {

using twrt::Array1D;

TEST(Multitone, StatusesInTheirOrder) {
    struct Case {
        int32_t count, n;
        double dt;
        int32_t mode, maxTones, status;
    };
    const Case cases[] = {
        {64, 64, 1, 0, 4, 0},
        {64, 0, 1, 9, -1, EmptyArrayErr},
        {64, 64, 0, 9, -1, NegativeArgumentErr},
        {64, 65, 0, 9, 4, SizeMismatchErr},
        {64, 2, 0, 9, 4, TooFewSamples3Err},
        {64, 64, 0, 9, 4, SampleIntervalErr},
        {64, 64, NAN, 9, 4, SampleIntervalErr},
        {64, 64, 1, 4, 4, InvalidSelectorErr},
        {64, 64, 1, -1, 4, InvalidSelectorErr},
    };
    for (const twrt::Placement p{false}; const Case& c : cases) {
        std::vector<double> v(static_cast<size_t>(c.count));
        for (size_t i = 0; i < v.size(); ++i) v[i] = std::sin(0.7 * static_cast<double>(i));
        Array1D<double> x(v), fr({9.0}), am({9.0}), ph({9.0}), res({9.0}), spec({9.0});
        int32_t found = -1;
        double dtOut = 7, f0 = 7, df = 7;
        EXPECT_EQ(MultipleToneMeasurements(x.h(), c.n, c.dt, 0, c.mode, 0.1, c.maxTones, &found, fr.h(), am.h(),
                                           ph.h(), res.h(), &dtOut, spec.h(), &f0, &df),
                  c.status)
            << c.n << " " << c.dt << " " << c.mode;
        if (c.status < 0) {
            EXPECT_EQ(fr.size() + am.size() + ph.size() + res.size() + spec.size(), 0);
            EXPECT_EQ(found, 0);
            EXPECT_EQ(dtOut + f0 + df, 0.0);
        } else {
            EXPECT_EQ(found, 1);
            EXPECT_EQ(fr.size(), 1);
            EXPECT_NEAR(fr[0], 0.7 / (2 * M_PI), 1e-6);
        }
    }
}

TEST(Multitone, HostResizeFailureIsOutOfMemory) {
    for (int32_t at = 1; at <= 9; ++at) {
        std::vector<double> v(100);
        for (size_t i = 0; i < v.size(); ++i) v[i] = std::sin(0.3 * static_cast<double>(i));
        Array1D<double> x(v), fr, am, ph, res, spec;
        int32_t found = -1;
        double dtOut = 7, f0 = 7, df = 7;
        TWRTFailResizeAt(at);
        const int32_t s = MultipleToneMeasurements(x.h(), 100, 1, 0, 1, 0.1, 3, &found, fr.h(), am.h(), ph.h(),
                                                   res.h(), &dtOut, spec.h(), &f0, &df);
        TWRTFailResizeAt(0);
        // Five resizes before the core, three after it.
        if (at == 9) {
            EXPECT_EQ(s, 0);
            EXPECT_EQ(found, 1);
            continue;
        }
        EXPECT_EQ(s, OutOfMemoryErr) << at;
        EXPECT_EQ(fr.size() + am.size() + ph.size() + res.size() + spec.size(), 0) << at;
        EXPECT_EQ(found, 0);
    }
}

}  // namespace
