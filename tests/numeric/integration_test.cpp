// Integration exports: check orders of both generations, and hand-worked values.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <vector>

#include "common/helpers.hpp"
#include "twanlys/numeric.h"
#include "twrt.hpp"

namespace {

using V = std::vector<double>;

class Integration : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

V Ramp(int n) {
    V v(n);
    for (int i = 0; i < n; ++i) v[i] = i + 1;
    return v;
}

TEST_P(Integration, OneDimensionStatusesAndValues) {
    struct Case {
        bool later;
        int n;
        int32_t method, status;
        double value;  // of the ramp 1, 2, ..., n with dt = -1
    };
    const Case cases[] = {
        {false, 0, 0, EmptyArrayErr, 0},
        {false, 1, 9, InvalidSelectorErr, 0},   // method before size
        {false, 1, -1, InvalidSelectorErr, 0},
        {false, 4, 3, SizeMismatchErr, 0},
        {false, 2, 0, 0, 1.5},
        {false, 4, 1, 0, 7.5},                  // Simpson, then a trapezoid on the last interval
        {false, 6, 3, 0, 17.5},                 // Bode, then the trapezoid
        {true, 0, 0, EmptyArrayErr, 0},
        {true, 3, 6, SizeMismatchErr, 0},       // size before method
        {true, 100, 6, InvalidSelectorErr, 0},
        {true, 5, -1, InvalidSelectorErr, 0},
        {true, 4, 3, SizeMismatchErr, 0},
        {true, 1, 4, SizeMismatchErr, 0},
        {true, 4, 4, 0, 6},                     // left rectangles
        {true, 4, 5, 0, 9},                     // right rectangles
        {true, 6, 2, 0, 17.5},
    };
    for (const Case& c : cases) {
        const twrt::Array1D<double> x(Ramp(c.n));
        double dt = -1, result = 0;
        int32_t method = c.method, status = 1;
        if (c.later)
            status = NumerIntegration_2017_head(x.h(), &dt, &method, &result);
        else
            NumerIntegration_head(x.h(), &dt, &method, &result, &status);
        EXPECT_EQ(status, c.status) << c.later << " n " << c.n << " method " << c.method;
        if (c.status < 0)
            EXPECT_TRUE(twtest::IsFailureNaN(result));
        else
            EXPECT_NEAR(result, c.value, 1e-14) << c.later << " n " << c.n << " method " << c.method;
    }
}

TEST_P(Integration, TwoDimensionStatuses) {
    struct Case {
        bool later;
        int rows, cols, steps;
        uint16_t method;
        int32_t status;
    };
    const Case cases[] = {
        {false, 0, 5, 2, 9, EmptyArrayErr},      // empty before everything
        {false, 2, 10, 2, 0, SizeMismatchErr},   // 3 samples even for the trapezoid
        {false, 3, 3, 1, 0, TooFewSamples2Err},
        {false, 3, 3, 2, 4, InvalidSelectorErr}, // rectangles only in 1-D
        {false, 3, 3, 2, 2, SizeMismatchErr},    // rows too short for the 3/8 rule
        {false, 3, 3, 2, 1, 0},
        {true, 4, 6, 2, 3, SizeMismatchErr},     // Bode's start terms need 5 samples
        {true, 5, 5, 2, 3, 0},
        {true, 3, 3, 2, 5, InvalidSelectorErr},
    };
    for (const Case& c : cases) {
        const twrt::Array2D<double> a(c.rows, c.cols, V(static_cast<size_t>(c.rows * c.cols), 1.0));
        const twrt::Array1D<double> steps(V(c.steps, -0.5));
        double result = 0;
        const int32_t status = c.later ? NumerIntegration2D_2017_head(a.h(), steps.h(), c.method, &result)
                                       : NumerIntegration2D_head(a.h(), steps.h(), c.method, &result);
        EXPECT_EQ(status, c.status) << c.rows << "x" << c.cols << " method " << c.method;
        if (c.status < 0)
            EXPECT_TRUE(twtest::IsFailureNaN(result));
        else
            EXPECT_NEAR(result, (c.rows - 1) * 0.5 * (c.cols - 1) * 0.5, 1e-14);
    }
}

// A 3-D block as the host lays it out: three i32 dimensions, then the elements.
struct Block3D {
    Block3D(int32_t d0, int32_t d1, int32_t d2, double value) {
        const size_t n = static_cast<size_t>(std::max(d0, 0) * std::max(d1, 0) * std::max(d2, 0));
        h = HostNewHandle(12 + n * sizeof(double));
        const int32_t dims[3] = {d0, d1, d2};
        std::memcpy(*h, dims, 12);
        for (size_t i = 0; i < n; ++i) std::memcpy(static_cast<char*>(*h) + 12 + 8 * i, &value, 8);
    }
    ~Block3D() { HostDisposeHandle(h); }
    void** h;
};

TEST_P(Integration, ThreeDimensions) {
    struct Case {
        bool later;
        int32_t d0, d1, d2;
        int steps;
        uint16_t method;
        int32_t status;
    };
    const Case cases[] = {
        {false, 3, 0, 3, 3, 0, EmptyArrayErr},
        {false, 3, 3, 2, 3, 0, SizeMismatchErr},
        {false, 3, 4, 5, 2, 0, TooFewSamples3Err},
        {false, 3, 4, 5, 3, 7, InvalidSelectorErr},
        {true, 5, 5, 4, 3, 3, SizeMismatchErr},
        {false, 3, 4, 5, 3, 0, 0},
        {true, 5, 6, 7, 3, 3, 0},
    };
    for (const Case& c : cases) {
        const Block3D a(c.d0, c.d1, c.d2, 2.0);
        const V all{1, -2, 3};
        const twrt::Array1D<double> steps(V(all.begin(), all.begin() + c.steps));
        double result = 0;
        const int32_t status = c.later ? NumerIntegration3D_2017_head(a.h, steps.h(), c.method, &result)
                                       : NumerIntegration3D_head(a.h, steps.h(), c.method, &result);
        EXPECT_EQ(status, c.status) << c.d0 << "x" << c.d1 << "x" << c.d2;
        if (c.status < 0)
            EXPECT_TRUE(twtest::IsFailureNaN(result));
        else  // constant 2 over (d1 - 1) x 2 (d0 - 1) x 3 (d2 - 1)
            EXPECT_NEAR(result, 2.0 * (c.d1 - 1) * 2 * (c.d0 - 1) * 3 * (c.d2 - 1), 1e-12);
    }
}

INSTANTIATE_TEST_SUITE_P(Placements, Integration, ::testing::Bool(), twtest::PlacementName);

}  // namespace
