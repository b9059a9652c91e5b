// The sweep's checks each catch the fault they are for: exports with one fault each, described by
// rows of their own (selftest.tsv) and judged by the same machinery as the library's exports.
#include <gtest/gtest.h>

#include <cstring>
#include <stdexcept>
#include <utility>

#include "frame/frame.hpp"
#include "sweep/fakes.hpp"
#include "sweep/runner.hpp"
#include "selftest_table.inc"

using namespace tw;

namespace {

void* g_leaked = nullptr;
int g_calls = 0;

// Copies x to y with the whole frame; `fault` names what to get wrong.
enum class Fault { None, Leak, NoShrink, Counter };
Status Copy(Handle x, Handle& y, Fault fault) {
    Frame f;
    if (fault != Fault::NoShrink) f.Output<double>(y);
    const int32_t n = Count(x);
    const double* xs = nullptr;
    double* out = nullptr;
    if (n < 1 && fault == Fault::Leak) g_leaked = ScratchAlloc(64);
    Status s = f.In(x, &xs);
    if (s == 0 && f.Resize(y, n < 1 ? 1 : n, &out) != 0) s = OutOfMemoryErr;
    if (s == 0 && n < 1) s = EmptyArrayErr;
    if (s == 0) std::memcpy(out, xs, static_cast<size_t>(n) * sizeof(double));
    if (s == 0 && fault == Fault::Counter) out[0] = ++g_calls;
    return fault == Fault::NoShrink && s != 0 ? s : f.Finish(s);
}

Status Mean(Handle x, double* mean, bool writeInput, bool nan) {
    Frame f;
    if (nan) f.Result(mean);
    *mean = 0;
    const int32_t n = Count(x);
    double* xs = nullptr;
    Status s = n < 1 ? EmptyArrayErr : 0;
    if (s == 0) s = writeInput ? f.InPlace(x, &xs) : f.In(x, const_cast<const double**>(&xs));
    for (int32_t i = 0; s == 0 && i < n; ++i) *mean += xs[i] / n;
    if (s == 0 && writeInput) xs[0] *= 2;
    return f.Finish(s);
}

}  // namespace

TW_EXTERN_C int32_t SweepFakeGood(Array1DHandle x, Array1DHandle y) { return Copy(x, y, Fault::None); }
TW_EXTERN_C int32_t SweepFakeLeaky(Array1DHandle x, Array1DHandle y) { return Copy(x, y, Fault::Leak); }
TW_EXTERN_C int32_t SweepFakeNoShrink(Array1DHandle x, Array1DHandle y) { return Copy(x, y, Fault::NoShrink); }
TW_EXTERN_C int32_t SweepFakeCounter(Array1DHandle x, Array1DHandle y) { return Copy(x, y, Fault::Counter); }
TW_EXTERN_C int32_t SweepFakeWritesInput(Array1DHandle x, double* mean, int32_t* status) {
    return ToPointer(status, Mean(x, mean, true, true));
}
TW_EXTERN_C int32_t SweepFakeNoNaN(Array1DHandle x, double* mean, int32_t* status) {
    return ToPointer(status, Mean(x, mean, false, false));
}
TW_EXTERN_C int32_t SweepFakeHalfZero(Array1DHandle x, ComplexDouble* z, int32_t* status) {
    const Status s = Count(x) > 0 ? 0 : EmptyArrayErr;
    if (s != 0) z->re = 0;
    return ToPointer(status, s);
}
TW_EXTERN_C int32_t SweepFakeStrangeStatus(Array1DHandle x) { return Count(x) > 0 ? -20000 : EmptyArrayErr; }
TW_EXTERN_C int32_t SweepFakeOffSet(Array1DHandle x) { return Count(x) > 0 ? DivideByZeroErr : EmptyArrayErr; }
TW_EXTERN_C int32_t SweepFakeIgnoresFlag(Array1DHandle y, double* mse, int32_t) {
    Frame f;
    f.Output<double>(y);
    f.Result(mse);
    double* ys = nullptr;
    const Status s = Count(y) < 1 ? EmptyArrayErr : f.InPlace(y, &ys);
    for (int32_t i = 0; s == 0 && i < Count(y); ++i) ys[i] *= 2;
    *mse = 0;
    return f.Finish(s);
}

TW_EXTERN_C void SweepFakeBufAlignment(int32_t n, double* x) {
    const double v = reinterpret_cast<uintptr_t>(x) % alignof(double) == 0 ? 1.0 : 2.0;
    if (n > 0) std::memcpy(x, &v, sizeof v);
}
TW_EXTERN_C int32_t SweepFakeCubeWrites(NumericHandle data, double* sum) {
    Frame f;
    f.Result(sum);
    int32_t d[3];
    std::memcpy(d, *data, sizeof d);
    if (d[0] < 1 || d[1] < 1 || d[2] < 1) return f.Finish(EmptyArrayErr);
    auto* x = static_cast<unsigned char*>(*data) + sizeof d;
    *sum = 0;
    for (int32_t k = 0; k < d[0] * d[1] * d[2]; ++k) {
        double v;
        std::memcpy(&v, x + k * sizeof v, sizeof v);
        *sum += v;
    }
    double first;
    std::memcpy(&first, x, sizeof first);
    first *= 2;
    std::memcpy(x, &first, sizeof first);
    return f.Finish(0);
}

namespace {

const sweep::Row& Fake(const char* name) {
    for (const sweep::Row& r : kselftestRows)
        if (std::strcmp(r.name, name) == 0) return r;
    throw std::runtime_error(name);
}

bool Mentions(const std::vector<std::string>& faults, const std::string& what) {
    for (const std::string& f : faults)
        if (f.find(what) != std::string::npos) return true;
    return false;
}

TEST(SweepSelfTest, TheCorrectFakePassesEveryCheck) {
    sweep::Tally tally;
    EXPECT_EQ(sweep::SweepRow(Fake("SweepFakeGood"), 8, &tally), std::vector<std::string>{});
    EXPECT_EQ(sweep::CompareThreads({&Fake("SweepFakeGood")}, 2), std::vector<std::string>{});
    EXPECT_GT(tally.calls, 40);
}

TEST(SweepSelfTest, EachFaultIsCaught) {
    // Scratch blocks are counted in the arena, so one is set up unless the suite runs in one.
    const bool ownArena = tw::InspectArena().live < 0;
    ErrorCluster e{};
    if (ownArena) InitializeAnalysisWorkspaceH(1 << 20, &e), EnableAnalysisWorkspaceH(&e);
    const struct {
        const char* fake;
        int32_t count;  // elements of x
        const char* caught;
    } cases[] = {
        {"SweepFakeLeaky", 0, "1 scratch blocks left live"},
        {"SweepFakeNoShrink", 0, "y not emptied on failure"},
        {"SweepFakeWritesInput", 4, "x is an input but was written"},
        {"SweepFakeNoNaN", 0, "mean is not NaN on failure"},
        {"SweepFakeHalfZero", 0, "z imag is not 0 on failure"},
        {"SweepFakeStrangeStatus", 4, "status -20000 is not in status.h"},
        {"SweepFakeOffSet", 4, "status -20060 DivideByZeroErr is outside the row's set st=wide,-DivideByZeroErr"},
        {"SweepFakeIgnoresFlag", 4, "y is an input but was written"},
        {"SweepFakeCubeWrites", 4, "data is an input but was written"},
    };
    for (const auto& c : cases) {
        const sweep::Row& row = Fake(c.fake);
        sweep::Case one = sweep::BaseCase(row);
        one[0].rows = c.count;
        for (int32_t a = 0; a < row.nArgs; ++a)
            if (row.args[a].inWhen >= 0) one[static_cast<size_t>(row.args[a].inWhen)].i = 1;  // the flag set
        std::vector<void*> cells(static_cast<size_t>(row.nArgs), nullptr);
        const sweep::Verdict v = sweep::CallAndJudge(row, one, cells.data(), 0);
        EXPECT_TRUE(Mentions(v.faults, c.caught)) << c.fake << " not caught: " << testing::PrintToString(v.faults);
        ScratchFree(std::exchange(g_leaked, nullptr));
    }
    if (ownArena) DisableAnalysisWorkspaceH(&e), UninitializeAnalysisWorkspaceH(&e);
    EXPECT_EQ(int32_t{e.code}, 0);
}

TEST(SweepSelfTest, ABarePointerSitsWhereAPackedBlockWouldPutIt) {
    sweep::Tally tally;
    EXPECT_TRUE(Mentions(sweep::SweepRow(Fake("SweepFakeBufAlignment"), 2, &tally), "packed and aligned blocks give"));
}

TEST(SweepSelfTest, ACallCountDiffersBetweenThreads) {
    EXPECT_TRUE(Mentions(sweep::CompareThreads({&Fake("SweepFakeCounter")}, 2), "differs from one thread"));
}

TEST(SweepSelfTest, TheExportComparisonNamesBothKindsOfStray) {
    const std::string nm = "0000000000001000 T Built\n0000000000002000 T Unlisted\n0000000000003000 T xerbla_\n";
    const std::vector<std::string> faults = sweep::CompareExports({"Built", "Missing"}, nm);
    EXPECT_EQ(faults, (std::vector<std::string>{"Unlisted is exported but its row has no signature",
                                                 "Missing has a signature but is not exported"}));
}

}  // namespace
