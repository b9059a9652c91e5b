#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <iterator>
#include <limits>
#include <vector>

#include "twanlys/generate.h"
#include "twrt.hpp"

namespace {

using Out = twrt::Array1D<double>;
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// One call of a noise export; returns the status. The exports with a status pointer leave their
// own result here.
int32_t gResult = 0;
using Call = std::function<int32_t(void** out, int32_t n, RandomState* st)>;

int32_t ByPointer(int32_t (*fn)(void**, int32_t*, double*, int32_t*, int32_t*, RandomState*), void** out,
                  int32_t n, RandomState* st) {
    double a = 1;
    int32_t seed = 5, status = 1;
    gResult = fn(out, &n, &a, &seed, &status, st);
    return status;
}

struct FailureRow {
    const char* what;
    Call call;
    int32_t length;
    int32_t expected;
};

// The parameter tests come before the length test; a refused call leaves the caller's record as
// it was and the output empty.
TEST(Noise, FailuresInTheirOrder) {
    const Call whiteCall = [](void** o, int32_t n, RandomState* st) { return ByPointer(white, o, n, st); };
    const Call gaussCall = [](void** o, int32_t n, RandomState* st) {
        double sd = 1;
        int32_t seed = 5, status = 1;
        GaussSpare spare{1, 0.25};
        gResult = Gauss(o, &n, &sd, &seed, &status, st, &spare);
        EXPECT_EQ(spare.haveSpare, 1);
        EXPECT_EQ(spare.spare, 0.25);
        return status;
    };
    const Call periodCall = [](void** o, int32_t n, RandomState* st) {
        double a = 1;
        int32_t seed = 5, status = 1;
        gResult = PeriodNoise(&n, &a, &seed, o, &status, st);
        return status;
    };
    const auto gamma = [](int32_t order) {
        return Call(
            [order](void** o, int32_t n, RandomState* st) { return GammaNoiseH(o, n, order, 5, st); });
    };
    const auto poisson = [](double mean) {
        return Call(
            [mean](void** o, int32_t n, RandomState* st) { return PoissonNoiseH(o, n, mean, 5, st); });
    };
    const auto binomial = [](int32_t trials, double p) {
        return Call([trials, p](void** o, int32_t n, RandomState* st) {
            BinomialCache cache{};
            return BinomialNoiseH(o, n, trials, p, 5, st, &cache);
        });
    };
    const FailureRow rows[] = {
        {"white empty", whiteCall, 0, EmptyArrayErr},
        {"white negative", whiteCall, -4, EmptyArrayErr},
        {"Gauss empty", gaussCall, 0, EmptyArrayErr},
        {"PeriodNoise empty", periodCall, 0, EmptyArrayErr},
        {"gamma order 0", gamma(0), 0, InvalidSelectorErr},
        {"gamma order -2", gamma(-2), 10, InvalidSelectorErr},
        {"gamma empty", gamma(1), 0, EmptyArrayErr},
        {"Poisson negative mean", poisson(-1e-300), 0, InvalidSelectorErr},
        {"Poisson NaN mean", poisson(kNaN), 10, InvalidSelectorErr},
        {"Poisson empty", poisson(0), -1, EmptyArrayErr},
        {"binomial negative trials", binomial(-1, 0.5), 0, InvalidSelectorErr},
        {"binomial p above 1", binomial(10, 1.0000001), 0, InvalidSelectorErr},
        {"binomial p below 0", binomial(10, -0.1), 10, InvalidSelectorErr},
        {"binomial p NaN", binomial(10, kNaN), 10, InvalidSelectorErr},
        {"binomial empty", binomial(0, 1.0), 0, EmptyArrayErr},
    };
    for (const FailureRow& r : rows) {
        SCOPED_TRACE(r.what);
        Out y{1, 2, 3};
        RandomState st{7, 8, 9};
        gResult = 0;
        EXPECT_EQ(r.call(y.h(), r.length, &st), r.expected);
        EXPECT_EQ(gResult, 0);
        EXPECT_EQ(y.size(), 0);
        EXPECT_EQ(st.s1, 7);
        EXPECT_EQ(st.s2, 8);
        EXPECT_EQ(st.s3, 9);
    }
    // A failed resize: OutOfMemoryErr, and the status-by-pointer exports return the host's code.
    const Call all[] = {whiteCall, gaussCall, periodCall, gamma(3), poisson(2), binomial(30, 0.2)};
    for (size_t i = 0; i < std::size(all); ++i) {
        Out y{1, 2, 3};
        RandomState st{7, 8, 9};
        gResult = 0;
        TWRTFailResizeAt(1);
        EXPECT_EQ(all[i](y.h(), 4, &st), OutOfMemoryErr);
        TWRTFailResizeAt(0);
        EXPECT_EQ(gResult, i < 3 ? TWRTResizeFailed : 0);
        EXPECT_EQ(y.size(), 0);
        EXPECT_EQ(st.s1, 7);
    }
}

// A record of zeros is a constant stream of 0.0: the polar samplers never accept a pair from it
// and give up instead of hanging; the samplers that accept at once still work.
TEST(Noise, ZeroRecordCannotHangTheRejectionSamplers) {
    {
        Out y;
        RandomState st{0, 0, 0};
        GaussSpare spare{0, 0};
        double sd = 1;
        int32_t n = 3, seed = 0, status = 0;
        Gauss(y.h(), &n, &sd, &seed, &status, &st, &spare);
        EXPECT_EQ(status, NoConvergenceErr);
        EXPECT_EQ(y.size(), 0);
    }
    {
        Out y;
        RandomState st{0, 0, 0};
        EXPECT_EQ(GammaNoiseH(y.h(), 3, 6, -1, &st), NoConvergenceErr);
        EXPECT_EQ(y.size(), 0);
    }
    {
        // Poisson: tan(0) puts the candidate on the mean, which the envelope accepts.
        Out y;
        RandomState st{0, 0, 0};
        EXPECT_EQ(PoissonNoiseH(y.h(), 3, 40.5, -1, &st), 0);
        EXPECT_EQ(y.vec(), std::vector<double>(3, 40.0));
    }
}

// Without a record or a spare the generators work on fresh zeroed ones for the call.
TEST(Noise, MissingRecordsAreFreshOnes) {
    Out a, b;
    RandomState st{0, 0, 0};
    GaussSpare spare{0, 0};
    double sd = 2;
    int32_t n = 5, seed = 99, status = -1;
    Gauss(a.h(), &n, &sd, &seed, &status, nullptr, nullptr);
    ASSERT_EQ(status, 0);
    Gauss(b.h(), &n, &sd, &seed, &status, &st, &spare);
    ASSERT_EQ(status, 0);
    EXPECT_EQ(a.vec(), b.vec());
    twrt::Array1D<uint32_t> c, d;
    BinomialCache cache{};
    ASSERT_EQ(BinomialNoiseH(c.h(), 50, 200, 0.4, 3, nullptr, nullptr), 0);
    ASSERT_EQ(BinomialNoiseH(d.h(), 50, 200, 0.4, 3, &st, &cache), 0);
    EXPECT_EQ(c.vec(), d.vec());
    EXPECT_EQ(cache.trials, 200);
    EXPECT_EQ(cache.p, 0.4);
}

}  // namespace
