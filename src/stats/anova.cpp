#include "stats/anova.hpp"

#include <cstdlib>

#include "stats/distributions.hpp"

namespace tw {

namespace {

// NaN is outside too: a NaN significance would otherwise run the bisection to its top.
bool OutsideUnit(double alpha) { return !(alpha >= 0.0 && alpha <= 1.0); }

// Level numbers of labels in order of first appearance. Open addressing on a power-of-two table
// at least twice the level count keeps a lookup O(1) whatever the labels; the last label is
// remembered because grouped data arrive in runs.
class LevelIndex {
public:
    Status Init(int32_t capacity) {
        int bits = 3;
        while ((int64_t{1} << bits) < 2 * int64_t{capacity}) ++bits;
        const size_t size = size_t{1} << bits;
        if (const Status s = slots_.Allocate(size)) return s;
        for (size_t i = 0; i < size; ++i) slots_[i].level = -1;
        shift_ = 64 - bits;
        mask_ = size - 1;
        capacity_ = capacity;
        return 0;
    }

    // The level of label, opening a new one while there is room; -1 when there is none.
    int32_t Find(int32_t label) {
        if (lastLevel_ >= 0 && label == lastLabel_) return lastLevel_;
        size_t i = static_cast<size_t>((uint64_t{static_cast<uint32_t>(label)} * 0x9E3779B97F4A7C15ull) >> shift_);
        while (slots_[i].level >= 0) {
            if (slots_[i].label == label) return Remember(label, slots_[i].level);
            i = (i + 1) & mask_;
        }
        if (open_ == capacity_) return -1;
        slots_[i] = {label, open_};
        return Remember(label, open_++);
    }

    int32_t Open() const { return open_; }
    Status Release() { return slots_.Release(); }

private:
    struct Slot {
        int32_t label;
        int32_t level;
    };
    int32_t Remember(int32_t label, int32_t level) {
        lastLabel_ = label;
        lastLevel_ = level;
        return level;
    }

    Scratch<Slot> slots_;
    int shift_ = 61;
    size_t mask_ = 0;
    int32_t capacity_ = 0, open_ = 0, lastLabel_ = 0, lastLevel_ = -1;
};

double UpperTail(double f, int32_t numeratorDf, int32_t denominatorDf) {
    return 1.0 - FisherCdfValue(f, numeratorDf, denominatorDf);
}

double CriticalF(double alpha, int32_t numeratorDf, int32_t denominatorDf) {
    double f = 0.0;
    // Cannot fail: both degrees are at least 1 and alpha lies in [0, 1].
    FisherQuantile(1.0 - alpha, numeratorDf, denominatorDf, &f);
    return f;
}

// |levels| * repeats == n without overflow: the running product never exceeds n in magnitude
// before a multiplication.
bool ObservationsMatch(int32_t n, int32_t repeats, const int32_t* levels, int factors) {
    int64_t product = repeats;
    for (int f = 0; f < factors; ++f) {
        if (std::llabs(product) > n) return false;
        product *= std::llabs(int64_t{levels[f]});
    }
    return product == n;
}

// A balanced full factorial of up to three factors, scanned once. Effects are the non-empty
// subsets of factors, by bit mask (A 1, B 2, C 4); the totals of an effect are indexed by the
// levels of its factors in mixed radix, the earlier factor most significant.
class Factorial {
public:
    static constexpr int kMaxFactors = 3;
    static constexpr int kMasks = 1 << kMaxFactors;

    Factorial(int factors, const int32_t* levels, int32_t repeats) : factors_(factors), repeats_(repeats) {
        for (int f = 0; f < factors; ++f) levels_[f] = static_cast<int32_t>(std::llabs(int64_t{levels[f]}));
    }

    int32_t Levels(int f) const { return levels_[f]; }

    Status Scan(const double* x, const int32_t* const* labels, int32_t n) {
        const int full = (1 << factors_) - 1;
        size_t total = 0;
        for (int m = 1; m <= full; ++m) {
            offset_[m] = total;
            total += static_cast<size_t>(TotalsOf(m));
        }
        const size_t cells = static_cast<size_t>(TotalsOf(full));
        Status s = totals_.Allocate(total);
        if (s == 0) s = counts_.Allocate(cells);
        for (int f = 0; f < factors_ && s == 0; ++f) s = index_[f].Init(levels_[f]);
        if (s != 0) return s;
        for (size_t i = 0; i < total; ++i) totals_[i] = 0.0;
        for (size_t i = 0; i < cells; ++i) counts_[i] = 0;

        for (int32_t i = 0; i < n; ++i) {
            int32_t level[kMaxFactors];
            for (int f = 0; f < factors_; ++f) {
                level[f] = index_[f].Find(labels[f][i]);
                if (level[f] < 0) return LevelMissingErr;
            }
            const double v = x[i];
            for (int m = 1; m <= full; ++m) totals_[offset_[m] + Position(m, level)] += v;
            ++counts_[Position(full, level)];
            sum_ += v;
            sumSquares_ += v * v;
        }
        // A level that never appeared leaves its cells empty, so this covers it too.
        for (size_t c = 0; c < cells; ++c)
            if (counts_[c] != repeats_) return UnbalancedDesignErr;
        return 0;
    }

    double Correction(int32_t n) const { return sum_ * sum_ / n; }
    double SumSquares() const { return sumSquares_; }

    // Sum of the squared totals of an effect over the observations behind each total.
    double SquaredTotals(int mask) const {
        const int64_t count = TotalsOf(mask);
        const double* t = totals_.get() + offset_[mask];
        double s = 0.0;
        for (int64_t i = 0; i < count; ++i) s += t[i] * t[i];
        int64_t per = repeats_;
        for (int f = 0; f < factors_; ++f)
            if ((mask & (1 << f)) == 0) per *= levels_[f];
        return s / static_cast<double>(per);
    }

    Status Release() {
        Status s = MergeRelease(0, totals_.Release());
        s = MergeRelease(s, counts_.Release());
        for (int f = 0; f < factors_; ++f) s = MergeRelease(s, index_[f].Release());
        return s;
    }

private:
    int64_t TotalsOf(int mask) const {
        int64_t count = 1;
        for (int f = 0; f < factors_; ++f)
            if (mask & (1 << f)) count *= levels_[f];
        return count;
    }
    size_t Position(int mask, const int32_t* level) const {
        size_t p = 0;
        for (int f = 0; f < factors_; ++f)
            if (mask & (1 << f)) p = p * static_cast<size_t>(levels_[f]) + static_cast<size_t>(level[f]);
        return p;
    }

    int factors_;
    int32_t levels_[kMaxFactors] = {};
    int32_t repeats_;
    size_t offset_[kMasks] = {};
    Scratch<double> totals_;
    Scratch<int32_t> counts_;
    LevelIndex index_[kMaxFactors];
    double sum_ = 0.0, sumSquares_ = 0.0;
};

// How a row of the table is tested.
constexpr int kNoTest = -1;      // no exact F ratio: F, critical F and p are -1
constexpr int kErrorRow = -2;    // the error row itself: F and critical F are 0
constexpr int kEmptyRow = -3;    // an interaction without degrees (one repeat): all zeros, p 0

struct Effect {
    double ss;
    int32_t df;
    int denominator;  // row index of the denominator mean square, or one of the markers above
};

// Fills rows x kAnovaColumns table values and rows - 1 probabilities.
void FillTable(const Effect* effects, int rows, double alpha, double* table, double* p) {
    for (int r = 0; r < rows; ++r) {
        const Effect& e = effects[r];
        double* row = table + r * kAnovaColumns;
        row[0] = e.ss;
        row[1] = e.df;
        row[2] = e.denominator == kEmptyRow ? 0.0 : e.ss / e.df;
    }
    for (int r = 0; r < rows; ++r) {
        const Effect& e = effects[r];
        double* row = table + r * kAnovaColumns;
        double f = 0.0, critical = 0.0, tail = 0.0;
        if (e.denominator == kNoTest) {
            // A stored distribution value of 2 marks the row, so 1 - 2 makes p = -1.
            f = -1.0;
            critical = -1.0;
            tail = 1.0 - 2.0;
        } else if (e.denominator >= 0) {
            const Effect& d = effects[e.denominator];
            f = row[2] / table[e.denominator * kAnovaColumns + 2];
            tail = UpperTail(f, e.df, d.df);
            critical = CriticalF(alpha, e.df, d.df);
        }
        row[3] = f;
        row[4] = critical;
        if (r < rows - 1) p[r] = tail;
    }
}

// Denominators of F by random factors, indexed rA * 4 + rB * 2 + rC; rows and columns A, B, C,
// AB, AC, BC, ABC, with 7 the error row.
constexpr int kThreeWayDenominators[8][7] = {
    {7, 7, 7, 7, 7, 7, 7},                     // none random
    {4, 5, 7, 6, 7, 7, 7},                     // C
    {3, 7, 5, 7, 6, 7, 7},                     // B
    {kNoTest, 5, 5, 6, 6, 7, 7},               // B, C
    {7, 3, 4, 7, 7, 6, 7},                     // A
    {4, kNoTest, 4, 6, 7, 6, 7},               // A, C
    {3, 3, kNoTest, 7, 6, 6, 7},               // A, B
    {kNoTest, kNoTest, kNoTest, 6, 6, 6, 7},   // A, B, C
};

}  // namespace

Status OneWayAnova(const double* x, const int32_t* labels, int32_t n, int32_t k, double alpha,
                   OneWayResult* r) {
    if (k < 2 || n <= k) return FactorLevelsErr;
    if (OutsideUnit(alpha)) return QuantileRangeErr;
    LevelIndex index;
    Scratch<double> sums;
    Scratch<int32_t> counts;
    Status s = index.Init(k);
    if (s == 0) s = sums.Allocate(static_cast<size_t>(k));
    if (s == 0) s = counts.Allocate(static_cast<size_t>(k));
    if (s != 0) return s;
    for (size_t j = 0; j < static_cast<size_t>(k); ++j) {
        sums[j] = 0.0;
        counts[j] = 0;
    }

    double t = 0.0, q = 0.0;
    for (int32_t i = 0; i < n; ++i) {
        const int32_t level = index.Find(labels[i]);
        if (level < 0) {
            s = LevelMissingErr;
            break;
        }
        const double v = x[i];
        sums[static_cast<size_t>(level)] += v;
        ++counts[static_cast<size_t>(level)];
        t += v;
        q += v * v;
    }
    if (s == 0 && index.Open() < k) s = LevelRepeatErr;
    if (s == 0) {
        const double c = t * t / n;
        const double total = q - c;
        double between = 0.0;
        for (int32_t j = 0; j < k; ++j) {
            const double level = sums[static_cast<size_t>(j)];
            between += level * level / counts[static_cast<size_t>(j)];
        }
        between = between - c;
        const double within = total - between;
        r->betweenSS = between;
        r->betweenMS = between / (k - 1);
        r->withinSS = within;
        r->withinMS = within / (n - k);
        r->totalSS = total;
        r->f = r->betweenMS / r->withinMS;
        r->p = UpperTail(r->f, k - 1, n - k);
        r->criticalF = CriticalF(alpha, k - 1, n - k);
    }
    s = MergeRelease(s, index.Release());
    s = MergeRelease(s, sums.Release());
    return MergeRelease(s, counts.Release());
}

Status TwoWayAnova(const double* x, const int32_t* const labels[2], int32_t n, int32_t repeats,
                   const int32_t levels[2], double alpha, double* table, double* p) {
    if (!ObservationsMatch(n, repeats, levels, 2)) return ObservationCountErr;
    if (std::abs(int64_t{levels[0]}) < 2 || std::abs(int64_t{levels[1]}) < 2) return FactorLevelsErr;
    if (repeats < 1) return LevelRepeatErr;
    if (repeats == 1 && (levels[0] < 0 || levels[1] < 0)) return RandomFactorErr;
    if (OutsideUnit(alpha)) return QuantileRangeErr;

    Factorial design(2, levels, repeats);
    Status s = design.Scan(x, labels, n);
    if (s == 0) {
        const int32_t a = design.Levels(0), b = design.Levels(1);
        const double c = design.Correction(n);
        const double cells = design.SquaredTotals(3) - c;
        const double ssA = design.SquaredTotals(1) - c;
        const double ssB = design.SquaredTotals(2) - c;
        const bool randomA = levels[0] < 0, randomB = levels[1] < 0;
        Effect e[kTwoWayRows];
        e[0] = {ssA, a - 1, randomB ? 2 : 3};
        e[1] = {ssB, b - 1, randomA ? 2 : 3};
        if (repeats >= 2) {
            e[2] = {cells - ssA - ssB, (a - 1) * (b - 1), 3};
            e[3] = {(design.SumSquares() - c) - cells, n - a * b, kErrorRow};
        } else {
            // One observation per cell: the interaction is the error.
            e[2] = {0.0, 0, kEmptyRow};
            e[3] = {cells - ssA - ssB, (a - 1) * (b - 1), kErrorRow};
        }
        FillTable(e, kTwoWayRows, alpha, table, p);
    }
    return MergeRelease(s, design.Release());
}

Status ThreeWayAnova(const double* x, const int32_t* const labels[3], int32_t n, int32_t repeats,
                     const int32_t levels[3], double alpha, double* table, double* p) {
    if (!ObservationsMatch(n, repeats, levels, 3)) return ObservationCountErr;
    if (repeats < 2) return TooFewRepeatsErr;
    for (int f = 0; f < 3; ++f)
        if (std::abs(int64_t{levels[f]}) < 2) return FactorLevelsErr;
    if (OutsideUnit(alpha)) return QuantileRangeErr;

    Factorial design(3, levels, repeats);
    Status s = design.Scan(x, labels, n);
    if (s == 0) {
        const int32_t a = design.Levels(0), b = design.Levels(1), cl = design.Levels(2);
        const double c = design.Correction(n);
        const double tA = design.SquaredTotals(1), tB = design.SquaredTotals(2);
        const double tC = design.SquaredTotals(4), tAB = design.SquaredTotals(3);
        const double tAC = design.SquaredTotals(5), tBC = design.SquaredTotals(6);
        const double tABC = design.SquaredTotals(7);
        const double ss[kThreeWayRows] = {
            tA - c,
            tB - c,
            tC - c,
            tAB - tA - tB + c,
            tAC - tA - tC + c,
            tBC - tB - tC + c,
            tABC - tAB - tAC - tBC + tA + tB + tC - c,
            design.SumSquares() - tABC,
        };
        const int32_t df[kThreeWayRows] = {
            a - 1, b - 1, cl - 1, (a - 1) * (b - 1), (a - 1) * (cl - 1), (b - 1) * (cl - 1),
            (a - 1) * (b - 1) * (cl - 1), n - a * b * cl,
        };
        const int random = (levels[0] < 0 ? 4 : 0) + (levels[1] < 0 ? 2 : 0) + (levels[2] < 0 ? 1 : 0);
        Effect e[kThreeWayRows];
        for (int r = 0; r < kThreeWayRows - 1; ++r) e[r] = {ss[r], df[r], kThreeWayDenominators[random][r]};
        e[kThreeWayRows - 1] = {ss[kThreeWayRows - 1], df[kThreeWayRows - 1], kErrorRow};
        FillTable(e, kThreeWayRows, alpha, table, p);
    }
    return MergeRelease(s, design.Release());
}

Status ContingencyChiSquare(const int32_t* counts, int32_t rows, int32_t cols, double* chiSquare,
                            double* p) {
    if (rows < 0 || cols < 0) return NegativeTableErr;
    if (rows < 2 || cols < 2) return MultipleRepeatedErr;
    const size_t r = static_cast<size_t>(rows), c = static_cast<size_t>(cols);
    for (size_t i = 0; i < r * c; ++i)
        if (counts[i] < 0) return NegativeTableErr;

    Scratch<double> rowSums, colSums;
    Status s = rowSums.Allocate(r);
    if (s == 0) s = colSums.Allocate(c);
    if (s == 0) {
        // In f64: counts near 1e9 overflow an i32 sum.
        for (size_t j = 0; j < c; ++j) colSums[j] = 0.0;
        double total = 0.0;
        for (size_t i = 0; i < r; ++i) {
            double sum = 0.0;
            for (size_t j = 0; j < c; ++j) {
                const double o = counts[i * c + j];
                sum += o;
                colSums[j] += o;
                total += o;
            }
            rowSums[i] = sum;
        }
        // A row or column of zeros makes an expected count 0 and the statistic NaN, unreported.
        double chi = 0.0;
        for (size_t i = 0; i < r; ++i)
            for (size_t j = 0; j < c; ++j) {
                const double expected = colSums[j] * rowSums[i] / total;
                const double d = counts[i * c + j] - expected;
                chi += d * d / expected;
            }
        double cdf = 0.0;
        s = ChiSquareCdf(chi, (rows - 1) * (cols - 1), &cdf);
        *chiSquare = chi;
        *p = 1.0 - cdf;
    }
    s = MergeRelease(s, rowSums.Release());
    return MergeRelease(s, colSums.Release());
}

}  // namespace tw
