// White-box checks of the frame machinery that no export of this folder reaches on its own.
#include <gtest/gtest.h>

#include "common/helpers.hpp"
#include "frame/frame.hpp"
#include "twrt.hpp"

namespace {

using tw::Frame;
using tw::Status;

TEST(MergeRelease, ReleaseStatusReplacesOnlySuccessOrAWarningByAnError) {
    struct Case {
        Status running, release, merged;
    };
    const Case cases[] = {
        {0, 0, 0},          {0, -20001, -20001},   {0, 20002, 20002},       {20003, -20001, -20001},
        {20003, 20002, 20003}, {-20003, -20001, -20003}, {-20003, 20002, -20003}, {20003, 0, 20003},
    };
    for (const Case& c : cases)
        EXPECT_EQ(tw::MergeRelease(c.running, c.release), c.merged) << c.running << " " << c.release;
}

TEST(Frame, FailureZeroesBothDimensionWordsOfMatrices) {
    twrt::Array2D<double> m(3, 4);
    twrt::Array1D<double> v{1, 2};
    double result[2] = {1, 2};
    NumericHandle mh = m.h(), vh = v.h();
    Frame f;
    f.Output2D<double>(mh);
    f.Output<double>(vh);
    f.Result(result, 2);
    EXPECT_EQ(f.Finish(EmptyArrayErr), EmptyArrayErr);
    EXPECT_EQ(m.rows(), 0);
    EXPECT_EQ(m.cols(), 0);
    EXPECT_EQ(v.size(), 0);
    EXPECT_TRUE(twtest::IsFailureNaN(result[0]) && twtest::IsFailureNaN(result[1]));
}

TEST(Frame, FftRuleTreatsWarningsAsFailure) {
    twrt::Array1D<double> v{1, 2};
    NumericHandle vh = v.h();
    Frame f(tw::FailOn::NonZero);
    f.Output<double>(vh);
    EXPECT_EQ(f.Finish(SingularPivotWarn), SingularPivotWarn);
    EXPECT_EQ(v.size(), 0);
}

// Written through an aligned view, the data land in the host block whatever its placement.
TEST(Frame, ResizedOutputsAreAlignedAndCommitted) {
    for (bool aligned : {false, true}) {
        twrt::Placement placement(aligned);
        twrt::Array1D<tw::cdouble> out;
        twrt::Array2D<double> m;
        NumericHandle oh = out.h(), mh = m.h();
        Frame f;
        tw::cdouble* o = nullptr;
        double* md = nullptr;
        ASSERT_EQ(f.Resize(oh, 3, &o), 0);
        ASSERT_EQ(f.Resize2D(mh, 2, 3, &md), 0);
        EXPECT_EQ(reinterpret_cast<uintptr_t>(o) % alignof(tw::cdouble), 0u);
        EXPECT_EQ(reinterpret_cast<uintptr_t>(md) % alignof(double), 0u);
        for (int i = 0; i < 3; ++i) o[i] = {double(i), -double(i)};
        for (int i = 0; i < 6; ++i) md[i] = i * 0.5;
        EXPECT_EQ(f.Finish(0), 0);
        EXPECT_EQ(out.size(), 3);
        EXPECT_EQ(out[2], tw::cdouble(2, -2));
        EXPECT_EQ(m.rows(), 2);
        EXPECT_EQ(m.cols(), 3);
        EXPECT_EQ(m.at(1, 2), 2.5);
    }
}

TEST(Frame, InPlaceDataAreWrittenBackOnSuccessOnly) {
    twrt::Placement packed(false);
    twrt::Array1D<double> ok{1, 2, 3}, bad{1, 2, 3};
    NumericHandle okh = ok.h(), badh = bad.h();
    {
        Frame f;
        double* d = nullptr;
        ASSERT_EQ(f.InPlace(okh, &d), 0);
        d[1] = 20;
        EXPECT_EQ(f.Finish(0), 0);
    }
    {
        Frame f;
        double* d = nullptr;
        ASSERT_EQ(f.InPlace(badh, &d), 0);
        d[1] = 20;
        EXPECT_EQ(f.Finish(WindowSumZeroErr), WindowSumZeroErr);
    }
    EXPECT_EQ(ok.vec(), (std::vector<double>{1, 20, 3}));
    EXPECT_EQ(bad.size(), 0);
}

TEST(Scratch, ReallocateKeepsContentsAndZeroReleases) {
    void* p = nullptr;
    ASSERT_EQ(tw::ScratchRealloc(&p, 16), 0);
    static_cast<char*>(p)[15] = 42;
    ASSERT_EQ(tw::ScratchRealloc(&p, 1 << 20), 0);
    EXPECT_EQ(static_cast<char*>(p)[15], 42);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(p) % 16, 0u);
    EXPECT_EQ(tw::ScratchRealloc(&p, 0), 0);
    EXPECT_EQ(p, nullptr);
    EXPECT_EQ(tw::ScratchFree(nullptr), 0);
}

}  // namespace
