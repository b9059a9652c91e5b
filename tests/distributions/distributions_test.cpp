// Check orders, boundary results and the bisections' fixed brackets of the distribution exports.
// Values marked "scipy" come from scipy.stats; the rest follow from the definitions.
#include "twanlys/distributions.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "twrt.h"

namespace {

constexpr double kInf = std::numeric_limits<double>::infinity();
const double kNaN = std::numeric_limits<double>::quiet_NaN();

// The exports take every scalar by pointer: these hold the arguments of one call.
int32_t InvN(double p, double* out, int32_t* s) { return InvNdist_head(&p, out, s); }
int32_t TCdf(double t, int32_t df, double* out, int32_t* s) { return TDist_head(&t, &df, out, s); }
int32_t TInv(double p, int32_t df, double* out, int32_t* s) { return InvTdist_head(&p, &df, out, s); }
int32_t FCdf(double f, int32_t d1, int32_t d2, double* out, int32_t* s) {
    return FDist_head(&f, &d1, &d2, out, s);
}
int32_t FInv(double p, int32_t d1, int32_t d2, double* out, int32_t* s) {
    return InvFDist_head(&p, &d1, &d2, out, s);
}
int32_t ChiCdf(double x, int32_t df, double* out, int32_t* s) { return ChiSquare_head(&x, &df, out, s); }
int32_t ChiInv(double p, int32_t df, double* out, int32_t* s) { return InvChiSquare_head(&p, &df, out, s); }

struct Row {
    std::string what;
    std::function<int32_t(double*, int32_t*)> call;
    int32_t status;
    double low, high;  // the result lies in [low, high]; NaN for low: the result is NaN
};

Row Exactly(std::string what, std::function<int32_t(double*, int32_t*)> call, int32_t status, double v) {
    return {std::move(what), std::move(call), status, v, v};
}

void Check(const std::vector<Row>& rows) {
    for (const Row& r : rows) {
        double out = -12345.0;
        int32_t status = -1;
        EXPECT_EQ(r.call(&out, &status), 0) << r.what;
        EXPECT_EQ(status, r.status) << r.what;
        if (std::isnan(r.low)) {
            EXPECT_TRUE(std::isnan(out)) << r.what << " gave " << out;
        } else {
            EXPECT_GE(out, r.low) << r.what;
            EXPECT_LE(out, r.high) << r.what;
        }
    }
}

using namespace std::placeholders;

TEST(Distributions, NormalPair) {
    double x = 0.0, p = -1.0;
    EXPECT_EQ(NormDist_head(&x, &p), 0);
    // The approximation's error shows at the centre.
    EXPECT_NE(p, 0.5);
    EXPECT_NEAR(p, 0.5, 1.2e-5);
    x = kNaN;
    NormDist_head(&x, &p);
    EXPECT_TRUE(std::isnan(p));
    Check({
        Exactly("p = -0.1", std::bind(InvN, -0.1, _1, _2), ProbabilityRangeErr, kNaN),
        Exactly("p = 1.1", std::bind(InvN, 1.1, _1, _2), ProbabilityRangeErr, kNaN),
        Exactly("p = 0", std::bind(InvN, 0.0, _1, _2), 0, -kInf),
        Exactly("p = 1", std::bind(InvN, 1.0, _1, _2), 0, kInf),
        // A NaN probability passes the range test and is not reported.
        Exactly("p = NaN", std::bind(InvN, kNaN, _1, _2), 0, kNaN),
        // scipy: norm.ppf(0.975) = 1.959963984540054
        {"p = 0.975", std::bind(InvN, 0.975, _1, _2), 0, 1.959963984540054 - 4.5e-4,
         1.959963984540054 + 4.5e-4},
    });
}

TEST(Distributions, ForwardChecksAndEnds) {
    Check({
        Exactly("t: 0 degrees", std::bind(TCdf, 1.0, 0, _1, _2), SampleCountErr, kNaN),
        Exactly("t: degrees before NaN t", std::bind(TCdf, kNaN, 0, _1, _2), SampleCountErr, kNaN),
        Exactly("t: NaN t", std::bind(TCdf, kNaN, 3, _1, _2), BoundsNanErr, kNaN),
        Exactly("t: centre is exactly one half", std::bind(TCdf, 0.0, 7, _1, _2), 0, 0.5),
        Exactly("t: -0", std::bind(TCdf, -0.0, 7, _1, _2), 0, 0.5),
        Exactly("t: +inf", std::bind(TCdf, kInf, 7, _1, _2), 0, 1.0),
        Exactly("t: -inf", std::bind(TCdf, -kInf, 7, _1, _2), 0, 0.0),
        // t with one degree is Cauchy: P(T <= 1) = 3/4
        {"t: Cauchy at 1", std::bind(TCdf, 1.0, 1, _1, _2), 0, 0.75 - 1e-15, 0.75 + 1e-15},
        Exactly("F: numerator 0", std::bind(FCdf, 1.0, 0, 5, _1, _2), SampleCountErr, kNaN),
        Exactly("F: denominator 0", std::bind(FCdf, 1.0, 5, 0, _1, _2), SampleCountErr, kNaN),
        Exactly("F: NaN f", std::bind(FCdf, kNaN, 5, 5, _1, _2), BoundsNanErr, kNaN),
        Exactly("F: f = 0", std::bind(FCdf, 0.0, 5, 5, _1, _2), 0, 0.0),
        Exactly("F: f < 0", std::bind(FCdf, -3.0, 5, 5, _1, _2), 0, 0.0),
        Exactly("F: +inf", std::bind(FCdf, kInf, 5, 5, _1, _2), 0, 1.0),
        // F(d, d) has its median at 1
        {"F: median of F(4, 4)", std::bind(FCdf, 1.0, 4, 4, _1, _2), 0, 0.5 - 1e-15, 0.5 + 1e-15},
        Exactly("chi: -1 degrees", std::bind(ChiCdf, 1.0, -1, _1, _2), SampleCountErr, kNaN),
        // 0 degrees pass the check and give a = 0 to the incomplete gamma function: NaN.
        Exactly("chi: 0 degrees", std::bind(ChiCdf, 1.0, 0, _1, _2), 0, kNaN),
        Exactly("chi: 0 degrees at 0", std::bind(ChiCdf, 0.0, 0, _1, _2), 0, 0.0),
        Exactly("chi: x < 0", std::bind(ChiCdf, -1.0, 3, _1, _2), 0, 0.0),
        Exactly("chi: +inf", std::bind(ChiCdf, kInf, 3, _1, _2), 0, 1.0),
        // two degrees: 1 - exp(-x/2)
        {"chi: two degrees", std::bind(ChiCdf, 2.0, 2, _1, _2), 0, 1 - std::exp(-1.0) - 1e-15,
         1 - std::exp(-1.0) + 1e-15},
    });
}

TEST(Distributions, InverseChecksAndFixedBrackets) {
    Check({
        Exactly("t: degrees first", std::bind(TInv, 2.0, 0, _1, _2), SampleCountErr, kNaN),
        Exactly("t: p > 1", std::bind(TInv, 1.5, 3, _1, _2), ProbabilityRangeErr, kNaN),
        Exactly("t: p < 0", std::bind(TInv, -1e-300, 3, _1, _2), ProbabilityRangeErr, kNaN),
        Exactly("t: p = 0", std::bind(TInv, 0.0, 3, _1, _2), 0, -kInf),
        Exactly("t: p = 1", std::bind(TInv, 1.0, 3, _1, _2), 0, kInf),
        {"t: median just below 0", std::bind(TInv, 0.5, 3, _1, _2), 0, -1e-4, -1e-300},
        // the quantile 3e11 lies beyond the bracket: its top, less the final width
        {"t: beyond the bracket", std::bind(TInv, 1 - 1e-12, 1, _1, _2), 0, 10000 - 1e-4, 10000},
        Exactly("t: below the bracket", std::bind(TInv, 1e-12, 1, _1, _2), 0, -10000.0),
        // Cauchy: quantile of 3/4 is 1
        {"t: Cauchy 3/4", std::bind(TInv, 0.75, 1, _1, _2), 0, 1 - 1e-4, 1},
        Exactly("F: degrees first", std::bind(FInv, 2.0, 3, 0, _1, _2), SampleCountErr, kNaN),
        Exactly("F: p > 1", std::bind(FInv, 1.5, 3, 3, _1, _2), ProbabilityRangeErr, kNaN),
        Exactly("F: p = 0", std::bind(FInv, 0.0, 3, 3, _1, _2), 0, 0.0),
        Exactly("F: p = 1", std::bind(FInv, 1.0, 3, 3, _1, _2), 0, kInf),
        // F(2, 2) at 1e-6 is 1e-6 / (1 + 1e-6): a smaller p leaves the lower end where it was.
        Exactly("F: below F(1e-6)", std::bind(FInv, 1e-7, 2, 2, _1, _2), 0, 1e-6),
        // F(2, 2): P(F <= f) = f / (1 + f), so the quantile of 1/2 is 1
        {"F: median of F(2, 2)", std::bind(FInv, 0.5, 2, 2, _1, _2), 0, 1 - 1e-4, 1},
        Exactly("chi: p first", std::bind(ChiInv, 1.5, 0, _1, _2), ProbabilityRangeErr, kNaN),
        Exactly("chi: then degrees", std::bind(ChiInv, 0.5, 0, _1, _2), SampleCountErr, kNaN),
        Exactly("chi: p = 0", std::bind(ChiInv, 0.0, 4, _1, _2), 0, 0.0),
        Exactly("chi: p = 1", std::bind(ChiInv, 1.0, 4, _1, _2), 0, kInf),
        // two degrees: quantile -2 ln(1 - p)
        {"chi: two degrees", std::bind(ChiInv, 0.5, 2, _1, _2), 0, 2 * std::log(2.0) - 1e-4,
         2 * std::log(2.0)},
        // scipy: chi2.ppf(0.5, 1e6) = 999999.3333334123, beyond 200 raises of the upper end
        {"chi: a million degrees", std::bind(ChiInv, 0.5, 1000000, _1, _2), 0, 999999.3333334123 - 1e-4,
         999999.3333334123},
    });
}

TEST(Distributions, NaNProbabilityIsNotReported) {
    double out = 0;
    int32_t status = -1;
    EXPECT_EQ(TInv(kNaN, 3, &out, &status), 0);
    EXPECT_EQ(status, 0);
    // Every comparison with NaN fails, so each step raises the lower end.
    EXPECT_GT(out, 10000 - 1e-4);
    EXPECT_EQ(ChiInv(kNaN, 3, &out, &status), 0);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(out, 0.0);
}

TEST(Distributions, ScalarFramesNeverReachTheHost) {
    const int64_t allocs = TWRTAllocCount(), resizes = TWRTResizeCount();
    double out;
    int32_t status;
    for (int32_t df = -1; df < 40; ++df) {
        TCdf(0.3 * df, df, &out, &status);
        TInv(0.01 * (df + 2), df, &out, &status);
        FInv(0.02 * (df + 2), df, 3, &out, &status);
        ChiInv(0.02 * (df + 2), df, &out, &status);
    }
    EXPECT_EQ(TWRTAllocCount(), allocs);
    EXPECT_EQ(TWRTResizeCount(), resizes);
}

}  // namespace
