// Check orders, the failure contract and exact corner results of the analysis-of-variance and
// contingency exports. Numerics, the factorial tables' -1 and all-zero rows included, are checked
// against SciPy in tests/reference/test_anova.py.
#include "twanlys/anova.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "common/helpers.hpp"
#include "twrt.hpp"

namespace {

using twrt::Array1D;
using twrt::Array2D;
using V = std::vector<double>;
using L = std::vector<int32_t>;
constexpr double kInf = std::numeric_limits<double>::infinity();

class Anova : public ::testing::TestWithParam<bool> {
protected:
    twrt::Placement placement_{GetParam()};
};

struct OneWayOut {
    double v[8];  // between SS, between MS, F, p, within SS, within MS, total SS, critical F
    int32_t status = -1;
};

OneWayOut OneWay(const V& x, const L& labels, int32_t k, double alpha) {
    const Array1D<double> xs(x);
    const Array1D<int32_t> ls(labels);
    OneWayOut o;
    Anova1Way_head_2017(xs.h(), ls.h(), &k, alpha, &o.v[0], &o.v[1], &o.v[2], &o.v[3], &o.v[4],
                        &o.v[5], &o.v[6], &o.v[7], &o.status);
    return o;
}

struct FactorialOut {
    std::vector<double> table;
    int32_t rows, cols;
    double p[7];
    int32_t status = -1;
};

// Two-way when c is empty. The table starts 3 by 3 so that a failure must shrink it.
FactorialOut Factorial(const V& x, const L& a, const L& b, const L& c, int32_t repeats,
                       std::vector<int32_t> levels, double alpha) {
    const Array1D<double> xs(x);
    const Array1D<int32_t> la(a), lb(b), lc(c);
    Array2D<double> table(3, 3, V(9, 1.0));
    FactorialOut o;
    double* p = o.p;
    if (c.empty())
        Anova2Way_head_2017(xs.h(), la.h(), lb.h(), &repeats, &levels[0], &levels[1], alpha, table.h(),
                            &p[0], &p[1], &p[2], &o.status);
    else
        ANOVA3Way_head_2017(xs.h(), la.h(), lb.h(), lc.h(), &repeats, &levels[0], &levels[1], &levels[2],
                            alpha, table.h(), &p[0], &p[1], &p[2], &p[3], &p[4], &p[5], &p[6], &o.status);
    o.table = table.vec();
    o.rows = table.rows();
    o.cols = table.cols();
    return o;
}

// Balanced labels for a full factorial, the first factor slowest; labels are level * 7 - 3.
std::vector<L> Cells(std::vector<int32_t> levels, int32_t repeats) {
    std::vector<L> out(levels.size());
    int32_t total = repeats;
    for (int32_t n : levels) total *= n;
    for (int32_t i = 0; i < total; ++i) {
        int32_t rest = i / repeats;
        for (size_t f = levels.size(); f-- > 0;) {
            out[f].push_back((rest % levels[f]) * 7 - 3);
            rest /= levels[f];
        }
    }
    return out;
}

V Data(size_t n) {
    V x(n);
    for (size_t i = 0; i < n; ++i) x[i] = std::sin(1.0 + static_cast<double>(i * i));
    return x;
}

TEST_P(Anova, OneWayStatusesInTheirOrder) {
    const V x{1, 2, 3, 4, 5, 6};
    const L l{7, 7, -3, -3, 100, 100};
    struct Case {
        std::string what;
        V x;
        L labels;
        int32_t k;
        double alpha;
        int32_t status;
    } cases[] = {
        {"empty before lengths", {}, {1, 2}, 1, 2.0, EmptyArrayErr},
        {"lengths before k", x, {7, 7}, 1, 0.05, EqSamplesErr},
        {"k below 2", x, l, 1, 2.0, FactorLevelsErr},
        {"k equal to n", x, l, 6, 0.05, FactorLevelsErr},
        {"alpha above 1", x, l, 3, 1.5, QuantileRangeErr},
        {"alpha NaN", x, l, 3, std::nan(""), QuantileRangeErr},
        {"alpha before the scan", x, {1, 2, 3, 4, 5, 5}, 3, -0.5, QuantileRangeErr},
        {"more labels than k", x, l, 2, 0.05, LevelMissingErr},
        {"a level never seen", x, l, 4, 0.05, LevelRepeatErr},
    };
    for (const Case& c : cases) {
        const OneWayOut o = OneWay(c.x, c.labels, c.k, c.alpha);
        EXPECT_EQ(o.status, c.status) << c.what;
        for (double v : o.v) EXPECT_TRUE(twtest::IsFailureNaN(v)) << c.what;
    }
}

TEST_P(Anova, OneWayExactCases) {
    // Groups {1, 2, 3} and {4, 5, 6}: every term is exact in binary.
    OneWayOut o = OneWay({1, 4, 2, 5, 3, 6}, {9, -5, 9, -5, 9, -5}, 2, 0.0);
    EXPECT_EQ(o.status, 0);
    EXPECT_EQ(V(o.v, o.v + 3), (V{13.5, 13.5, 13.5}));
    EXPECT_EQ(V(o.v + 4, o.v + 8), (V{4, 1, 17.5, kInf}));
    // Constant groups: F = 4 / 0 is infinite and p 0; constant data: F = 0 / 0 gives NaN p.
    o = OneWay({0, 0, 2, 2}, {1, 1, 2, 2}, 2, 1.0);
    EXPECT_EQ(o.status, 0);
    EXPECT_EQ(o.v[2], kInf);
    EXPECT_EQ(o.v[3], 0.0);
    EXPECT_EQ(o.v[7], 0.0);  // alpha 1
    o = OneWay({3, 3, 3, 3}, {1, 1, 2, 2}, 2, 0.5);
    EXPECT_EQ(o.status, 0);
    EXPECT_TRUE(std::isnan(o.v[2]) && std::isnan(o.v[3]));
}

TEST_P(Anova, FactorialStatusesInTheirOrder) {
    const std::vector<L> two = Cells({2, 3}, 2), three = Cells({2, 2, 2}, 2);
    L extra = two[0], unbalanced = two[1], three_extra = three[2];
    extra[5] = 99;            // a third level of A
    unbalanced[0] = two[1][2];  // one cell of three, one of one: n still right
    three_extra[0] = 99;
    struct Case {
        std::string what;
        size_t n;
        std::vector<L> labels;
        int32_t repeats;
        std::vector<int32_t> levels;
        double alpha;
        int32_t status;
    } cases[] = {
        {"label lengths", 12, {two[0], L(11, 0)}, 2, {2, 3}, 0.05, EqSamplesErr},
        {"lengths before counts", 12, {two[0], L(11, 0)}, 0, {5, 3}, 0.05, EqSamplesErr},
        {"product", 12, two, 2, {3, 3}, 0.05, ObservationCountErr},
        {"levels below 2", 12, two, 2, {1, 6}, 0.05, FactorLevelsErr},
        {"no repeats", 0, {{}, {}}, 0, {2, 3}, 0.05, LevelRepeatErr},
        {"one repeat, random", 6, Cells({2, 3}, 1), 1, {2, -3}, 0.05, RandomFactorErr},
        {"alpha", 12, two, 2, {-2, -3}, -0.1, QuantileRangeErr},
        {"a label without room", 12, {extra, two[1]}, 2, {2, 3}, 0.05, LevelMissingErr},
        {"unbalanced cells", 12, {two[0], unbalanced}, 2, {2, 3}, 0.05, UnbalancedDesignErr},
        {"three: lengths", 16, {three[0], three[1], L(3, 0)}, 2, {2, 2, 2}, 0.05, EqSamplesErr},
        {"three: product", 16, three, 2, {2, 2, 3}, 0.05, ObservationCountErr},
        {"three: one repeat", 8, Cells({2, 2, 2}, 1), 1, {4, 2, 1}, 0.05, TooFewRepeatsErr},
        {"three: levels", 16, Cells({2, 1, 4}, 2), 2, {2, 1, 4}, 0.05, FactorLevelsErr},
        {"three: alpha", 16, three, 2, {2, 2, 2}, 7.0, QuantileRangeErr},
        {"three: no room", 16, {three[0], three[1], three_extra}, 2, {2, 2, 2}, 0.05, LevelMissingErr},
    };
    for (const Case& c : cases) {
        const FactorialOut o = Factorial(Data(c.n), c.labels[0], c.labels[1],
                                         c.labels.size() > 2 ? c.labels[2] : L{}, c.repeats, c.levels, c.alpha);
        EXPECT_EQ(o.status, c.status) << c.what;
        EXPECT_EQ(o.rows, 0) << c.what;
        EXPECT_EQ(o.cols, 0) << c.what;
        for (size_t i = 0; i < (c.labels.size() > 2 ? 7u : 3u); ++i)
            EXPECT_TRUE(twtest::IsFailureNaN(o.p[i])) << c.what;
    }
}

TEST_P(Anova, Contingency) {
    struct Case {
        int32_t rows, cols;
        L counts;
        int32_t status;
        double chi, p;  // NaN chi: both results NaN
    } cases[] = {
        {2, 2, {5, 5, 5, 5}, 0, 0.0, 1.0},
        {2, 2, {10, 0, 0, 10}, 0, 20.0, std::erfc(std::sqrt(10.0))},  // upper tail of 20 on 1 degree
        {3, 2, {1, 2, 0, 0, 3, 4}, 0, std::nan(""), std::nan("")},
        {1, 4, {1, 2, 3, 4}, MultipleRepeatedErr, 0, 0},
        {2, 1, {1, 2}, MultipleRepeatedErr, 0, 0},
        {0, 0, {}, MultipleRepeatedErr, 0, 0},
        {-1, 2, {}, NegativeTableErr, 0, 0},
        {2, 2, {1, -2, 3, 4}, NegativeTableErr, 0, 0},
    };
    for (const Case& c : cases) {
        Array2D<int32_t> table(c.rows < 0 ? 0 : c.rows, c.cols, c.counts);
        std::memcpy(*table.h(), &c.rows, 4);
        double chi = 0, p = 0;
        int32_t status = -1;
        Contingency_head(table.h(), &chi, &p, &status);
        EXPECT_EQ(status, c.status) << c.rows << "x" << c.cols;
        if (c.status != 0) {
            EXPECT_TRUE(twtest::IsFailureNaN(chi) && twtest::IsFailureNaN(p));
            continue;
        }
        if (std::isnan(c.chi)) {
            EXPECT_TRUE(std::isnan(chi) && std::isnan(p));
        } else {
            EXPECT_EQ(chi, c.chi);
            EXPECT_NEAR(p, c.p, 1e-15);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Placements, Anova, ::testing::Values(false, true), twtest::PlacementName);

}  // namespace
