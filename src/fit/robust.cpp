// Bisquare and least-absolute-residual fits: the robust weights, the leverage adjustment, the
// general cores, the two straight lines and the loops around the nonlinear models.
#include "fit/robust.hpp"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <utility>

#include "matrix/matrix_core.hpp"
#include "matrix/solve.hpp"
#include "numeric/sort.hpp"
#include "stats/descriptive.hpp"

namespace tw {

namespace {

constexpr double kTuning = 4.685;
constexpr double kConsistency = 0.6745;
constexpr double kLeverageLimit = 0.9999;
constexpr double kLeverageFactor = 10000.0000000011;    // 1 / (1 - limit), as used unweighted
constexpr double kLeverageGap = 9.999999999998899e-05;  // 1 - limit, as used weighted
constexpr double kFloorRatio = 0.01;
constexpr double kFloorFallback = 1e-07;
constexpr double kFirstPassOffset = 100000.0;  // makes the first convergence test fail

size_t Cells(int32_t rows, int32_t cols) { return static_cast<size_t>(rows) * static_cast<size_t>(cols); }

// The median of values known to be free of NaN only when the data were; NaN means the fit broke.
Status MedianOf(const double* v, int32_t n, double* m) {
    const Status s = Median(v, n, m);
    return s == BoundsNanErr ? NanInfErr : s;
}

// Which of the last, the one before and the start wins; ties go to the later test.
enum class Pick { Latest, Before, Start };
Pick Choose(double current, double previous, double start) {
    Pick p = Pick::Latest;
    if (current <= previous && current <= start) p = Pick::Latest;
    if (previous <= current && previous <= start) p = Pick::Before;
    if (start <= previous && start <= current) p = Pick::Start;
    return p;
}

// Weighted median of sorted q: the first value whose running weight reaches half the total.
double WeightedMedian(const double* q, const double* v, int32_t n) {
    double total = 0;
    for (int32_t i = 0; i < n; ++i) total += v[i];
    const double half = total * 0.5;
    double run = 0;
    for (int32_t i = 0; i < n; ++i) {
        run += v[i];
        if (run >= half) return q[i];
    }
    return q[n - 1];
}

void LineValues(const double* x, int32_t n, double a, double b, double* f) {
    for (int32_t i = 0; i < n; ++i) f[i] = x[i] * a + b;
}

}  // namespace

Status InverseResidualWeights(const double* y, const double* f, const double* w, int32_t n, double* r,
                              double* v) {
    for (int32_t i = 0; i < n; ++i) r[i] = std::fabs(y[i] - f[i]);
    double med = 0;
    if (const Status s = MedianOf(r, n, &med)) return s;
    double t = kFloorRatio * med;
    if (med == 0) t = kFloorFallback;
    for (int32_t i = 0; i < n; ++i) {
        const double d = std::max(r[i], t);
        v[i] = w != nullptr ? std::fabs(w[i] / d) : std::fabs(1 / d);
    }
    return 0;
}

Status BisquarePass(const double* r, const double* w, int32_t n, double* rw, int32_t* zeros,
                    bool* scaleZero) {
    *zeros = 0;
    *scaleZero = false;
    Scratch<double> work;
    if (work.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* d = work.get();
    double m = 0;
    if (const Status s = MedianOf(r, n, &m)) return s;
    double top = 0;
    for (int32_t i = 0; i < n; ++i) top = std::max(top, d[i] = std::fabs(r[i] - m));
    if (!(top > std::fabs(m)))
        for (int32_t i = 0; i < n; ++i) d[i] = std::fabs(r[i]);
    double s = 0;
    if (const Status st = MedianOf(d, n, &s)) return st;
    if (s == 0) Mean(d, n, &s);
    if (s == 0) {
        *scaleZero = true;
        return work.Release();
    }
    const double k = kConsistency / (s * kTuning);
    for (int32_t i = 0; i < n; ++i) {
        const double u = r[i] * k;
        double v = 0;
        if (std::fabs(u) < 1) {
            const double t = 1 - u * u;
            v = t * t;
        } else {
            ++*zeros;
        }
        rw[i] = w != nullptr ? v * std::fabs(w[i]) : v;
    }
    return work.Release();
}

Status LeverageAdjust(const double* j, const double* w, int32_t n, int32_t k, bool leverageByWeight,
                      double* adj) {
    Scratch<double> work;
    if (work.Allocate(2 * Cells(k, k)) != 0) return OutOfMemoryErr;
    double* g = work.get();
    double* p = g + Cells(k, k);
    std::fill(g, g + Cells(k, k), 0.0);
    for (int32_t i = 0; i < n; ++i) {
        const double* row = j + Cells(i, k);
        const double q = w != nullptr ? std::fabs(w[i]) : 1.0;
        for (int32_t a = 0; a < k; ++a)
            for (int32_t b = 0; b <= a; ++b) g[Cells(a, k) + b] += q * row[a] * row[b];
    }
    for (int32_t a = 0; a < k; ++a)
        for (int32_t b = a + 1; b < k; ++b) g[Cells(a, k) + b] = g[Cells(b, k) + a];
    if (const Status s = PseudoInverse<double>(g, k, k, -1.0, p)) return s;
    for (int32_t i = 0; i < n; ++i) {
        const double* row = j + Cells(i, k);
        double h = 0;
        for (int32_t a = 0; a < k; ++a) {
            double t = 0;
            for (int32_t b = 0; b < k; ++b) t += p[Cells(a, k) + b] * row[b];
            h += row[a] * t;
        }
        if (w == nullptr) {
            adj[i] = h <= kLeverageLimit ? std::sqrt(1 / (1 - h)) : std::sqrt(kLeverageFactor);
        } else {
            const double q = std::fabs(w[i]);
            if (leverageByWeight) h *= q;
            adj[i] = h <= kLeverageLimit ? std::sqrt(q / (1 - h)) : std::sqrt(q / kLeverageGap);
        }
    }
    return work.Release();
}

double MeanAbsResidual(const double* y, const double* f, const double* w, int32_t n) {
    double sum = 0;
    for (int32_t i = 0; i < n; ++i)
        sum += w != nullptr ? std::fabs((y[i] - f[i]) * w[i]) : std::fabs(y[i] - f[i]);
    return sum / n;
}

Status GenBisquareCore(const double* h, int32_t n, int32_t k, const double* y, const double* w,
                       double* weightsOut, uint32_t method, double tolerance, int32_t* iterations,
                       double* coef, double* fit, double* covariance, double* mse) {
    const double tol = IterationTolerance(tolerance);
    if (n < k) return PolyOrderErr;
    if (HasNonFinite(y, n) ||
        HasNonFinite(h, static_cast<int32_t>(std::min<size_t>(Cells(n, k), INT32_MAX))) ||
        (w != nullptr && HasNonFinite(w, n)))
        return NanInfErr;
    double e = 0;
    Status st = GeneralLeastSquares(h, n, k, y, w, method, coef, covariance, fit, &e);
    if (st < 0) return st;
    if (!std::isfinite(e)) return NoRootErr;
    Scratch<double> work;
    if (work.Allocate(3 * static_cast<size_t>(n) + static_cast<size_t>(k)) != 0) return OutOfMemoryErr;
    double* adj = work.get();
    double* r = adj + n;
    double* rw = r + n;
    double* prev = rw + n;
    if (const Status s = LeverageAdjust(h, w, n, k, true, adj)) return s;
    const int32_t limit = iterations != nullptr ? *iterations : 0;
    int32_t count = 0;
    for (;;) {
        if (count > 0) {
            if (count >= limit) break;
            bool settled = true;
            for (int32_t j = 0; j < k; ++j)
                settled = settled && std::fabs(coef[j] - prev[j]) <= std::fabs(coef[j]) * tol;
            if (settled) break;
        }
        if (e <= tol * 0.0001) break;
        std::memcpy(prev, coef, static_cast<size_t>(k) * sizeof(double));
        for (int32_t i = 0; i < n; ++i) r[i] = (y[i] - fit[i]) * adj[i];
        int32_t zeros = 0;
        bool exact = false;
        if (const Status s = BisquarePass(r, w, n, rw, &zeros, &exact)) return s;
        if (exact) break;
        if (zeros >= n - k) return NoRootErr;
        st = GeneralLeastSquares(h, n, k, y, rw, method, coef, nullptr, fit, &e);
        if (st < 0) return st;
        if (!std::isfinite(e)) return NoRootErr;
        ++count;
    }
    if (weightsOut != nullptr && count > 0)
        std::memcpy(weightsOut, rw, static_cast<size_t>(n) * sizeof(double));
    if (iterations != nullptr) *iterations = count;
    if (mse != nullptr) *mse = e;
    return MergeRelease(st, work.Release());
}

Status GenLarCore(const double* h, int32_t n, int32_t k, const double* y, const double* w, uint32_t method,
                  double tolerance, double floor, int32_t limit, double* coef, double* fit,
                  double* covariance, double* mae) {
    // The family's default floor applies here too: 0 or below means 1e-12.
    const double tol = IterationTolerance(tolerance), fl = MseFloor(floor);
    if (n < k) return PolyOrderErr;
    Status st = GeneralLeastSquares(h, n, k, y, w, method, coef, nullptr, nullptr, nullptr);
    if (st < 0) return st;
    Scratch<double> work;
    if (work.Allocate(3 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* latest = work.get();
    double* before = latest + n;
    double* r = before + n;
    AxVect<double>(h, n, k, coef, fit);
    const double mae0 = MeanAbsResidual(y, fit, w, n);
    double prev = 2 * mae0, current = mae0;
    for (int32_t i = 0; i < n; ++i) latest[i] = w != nullptr ? w[i] : 1.0;
    int32_t count = 0;
    while (count == 0 ||
           (count < limit && std::fabs(prev - current) > prev * tol && fl < prev && fl < current)) {
        prev = current;
        std::swap(latest, before);
        if (const Status s = InverseResidualWeights(y, fit, w, n, r, latest)) return s;
        st = GeneralLeastSquares(h, n, k, y, latest, method, coef, nullptr, nullptr, nullptr);
        if (st < 0) return st;
        AxVect<double>(h, n, k, coef, fit);
        current = MeanAbsResidual(y, fit, w, n);
        ++count;
    }
    // Every test that holds refits, so in a tie the later choice stands.
    const double* chosen[3] = {nullptr, nullptr, nullptr};
    int32_t m = 0;
    if (current <= prev && current <= mae0) chosen[m++] = latest;
    if (prev <= current && prev <= mae0) chosen[m++] = before;
    if (mae0 <= prev && mae0 <= current) chosen[m++] = w;
    for (int32_t i = 0; i < m; ++i) {
        st = GeneralLeastSquares(h, n, k, y, chosen[i], method, coef, covariance, nullptr, nullptr);
        if (st < 0) return st;
    }
    AxVect<double>(h, n, k, coef, fit);
    *mae = MeanAbsResidual(y, fit, w, n);
    return MergeRelease(st, work.Release());
}

Status RobustPolySolve(int32_t kind, RobustTuning tuning, const double* h, int32_t n, int32_t k,
                       const double* y, const double* w, uint32_t method, double* coef) {
    if (kind != PolyLeastAbsolute && kind != PolyBisquare) return InvalidSelectorErr;
    Scratch<double> work;
    if (work.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double e = 0;
    Status st;
    if (kind == PolyBisquare) {
        st = GenBisquareCore(h, n, k, y, w, nullptr, method, tuning.tolerance1, tuning.iterations, coef,
                             work.get(), nullptr, &e);
    } else {
        const int32_t limit = tuning.iterations != nullptr ? *tuning.iterations : 0;
        st = GenLarCore(h, n, k, y, w, method, tuning.tolerance1, tuning.tolerance2, limit, coef, work.get(),
                        nullptr, &e);
    }
    return MergeRelease(st, work.Release());
}

Status BisquareLine(const double* x, const double* y, const double* w, int32_t n, double tolerance,
                    int32_t limit, double* slope, double* intercept, double* fit, double* mse, int32_t* count,
                    const LineBounds* bounds) {
    if (bounds != nullptr && n <= 2) {
        if (count != nullptr) *count = 0;
        return BoundedLine(x, y, w, n, *bounds, slope, intercept, fit, mse);
    }
    // The start and every refit: the free line, or the bounded one.
    const auto refit = [&](const double* v, double* a, double* b) {
        return bounds != nullptr ? BoundedLine(x, y, v, n, *bounds, a, b, nullptr, nullptr)
                                 : LineFit(x, y, v, n, a, b, nullptr, nullptr);
    };
    if (n < 2) return TooFewSamples2Err;
    const double* vw = nullptr;
    if (const Status s = VetWeights(w, n, 1, &vw)) return s;
    const double tol = IterationTolerance(tolerance);
    Scratch<double> work;
    if (work.Allocate(5 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* adj = work.get();
    double* r = adj + n;
    double* rw = r + n;
    double* j = rw + n;  // n by 2, reused for the fitted values at the end
    double a = 0, b = 0;
    int32_t passes = 0;
    if (n == 2) {
        a = (y[1] - y[0]) / (x[1] - x[0]);
        b = y[0] - a * x[0];
    } else {
        if (const Status s = refit(vw, &a, &b)) return s;
        for (int32_t i = 0; i < n; ++i) j[2 * i] = x[i], j[2 * i + 1] = 1.0;
        if (const Status s = LeverageAdjust(j, vw, n, 2, true, adj)) return s;
        double pa = a + kFirstPassOffset, pb = b + kFirstPassOffset;
        for (;;) {
            // One settled parameter is enough; the first pass always runs.
            if (passes > 0 && (passes >= limit || std::fabs(pa - a) <= std::fabs(pa) * tol ||
                               std::fabs(pb - b) <= std::fabs(pb) * tol))
                break;
            pa = a, pb = b;
            for (int32_t i = 0; i < n; ++i) r[i] = (y[i] - x[i] * a - b) * adj[i];
            int32_t zeros = 0;
            bool exact = false;
            if (const Status s = BisquarePass(r, vw, n, rw, &zeros, &exact)) return s;
            if (exact || zeros >= n - 1) break;
            if (const Status s = refit(rw, &a, &b)) return s;
            ++passes;
        }
    }
    *slope = a;
    *intercept = b;
    if (count != nullptr) *count = passes;
    double* f = j;
    LineValues(x, n, a, b, f);
    if (mse != nullptr && bounds != nullptr) {
        double sum = 0;
        for (int32_t i = 0; i < n; ++i)
            sum += (y[i] - f[i]) * (y[i] - f[i]) * (vw != nullptr ? std::fabs(vw[i]) : 1.0);
        *mse = sum / n;
    } else if (mse != nullptr) {
        *mse = FitMse(y, f, vw, n, MseWalk::Forward);
    }
    if (fit != nullptr) std::memcpy(fit, f, static_cast<size_t>(n) * sizeof(double));
    return work.Release();
}

Status LarLine(const double* x, const double* y, const double* w, int32_t n, double tolerance, double floor,
               int32_t limit, double* slope, double* intercept, double* fit, double* mae, int32_t* count,
               const LineBounds* bounds) {
    const double tol = IterationTolerance(tolerance), fl = MseFloor(floor);
    if (bounds != nullptr && n <= 2) {
        // fit may be y: the values go to a block of their own until the mae is taken.
        if (count != nullptr) *count = 0;
        double f[2] = {0, 0}, e = 0;
        if (const Status s = BoundedLine(x, y, w, n, *bounds, slope, intercept, f, &e)) return s;
        const double* vw = w;
        if (n > 1) VetWeights(w, n, 1, &vw);
        if (mae != nullptr) *mae = n > 0 ? MeanAbsResidual(y, f, vw, n) : 0.0;
        if (fit != nullptr) std::copy(f, f + n, fit);
        return 0;
    }
    const auto clampTo = [&](int32_t j, double v) {
        return bounds != nullptr ? std::clamp(v, bounds->lower[j], bounds->upper[j]) : v;
    };
    if (n < 2) return TooFewSamples2Err;
    const double* vw = nullptr;
    if (const Status s = VetWeights(w, n, 1, &vw)) return s;
    Scratch<double> work;
    if (work.Allocate(3 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* q = work.get();
    double* v = q + n;
    double* f = v + n;
    if (n == 2) {
        const double a = (y[1] - y[0]) / (x[1] - x[0]);
        *slope = a;
        *intercept = y[0] - a * x[0];
        if (count != nullptr) *count = 0;
        if (mae != nullptr) *mae = 0;
        if (fit != nullptr) LineValues(x, n, a, *intercept, fit);
        return work.Release();
    }
    double a = 0, b = 0;
    const Status start = bounds != nullptr ? BoundedLine(x, y, vw, n, *bounds, &a, &b, nullptr, nullptr)
                                           : LineFit(x, y, vw, n, &a, &b, nullptr, nullptr);
    if (start != 0) return start;
    int32_t zero = -1, zeros = 0;
    for (int32_t i = 0; i < n; ++i)
        if (x[i] == 0) zero = i, ++zeros;
    if (zeros > 1) return MultipleRepeatedErr;
    const int32_t stack = (2 * n) / 7 + 2;
    LineValues(x, n, a, b, f);
    const double mae0 = MeanAbsResidual(y, f, vw, n);
    double prev = 2 * mae0, current = mae0;
    double line[3][2] = {{a, b}, {a, b}, {a, b}};  // latest, before, start
    int32_t passes = 0;
    if (limit > 0) {
        while (passes < limit) {
            if (std::fabs(current - prev) <= tol * prev || current <= fl || prev <= current) break;
            prev = current;
            line[1][0] = line[0][0], line[1][1] = line[0][1];
            int32_t m = 0;
            for (int32_t i = 0; i < n; ++i) {
                if (i == zero) continue;
                q[m] = (y[i] - b) / x[i];
                v[m++] = vw != nullptr ? std::fabs(x[i] * vw[i]) : std::fabs(x[i]);
            }
            if (const Status s = SortAscendingPaired(q, v, m, stack)) return s;
            a = clampTo(0, WeightedMedian(q, v, m));
            for (int32_t i = 0; i < n; ++i) q[i] = y[i] - x[i] * a;
            if (vw != nullptr) {
                for (int32_t i = 0; i < n; ++i) v[i] = std::fabs(vw[i]);
                if (const Status s = SortAscendingPaired(q, v, n, stack)) return s;
                b = clampTo(1, WeightedMedian(q, v, n));
            } else {
                // Unit weights: the running sum after i values is i + 1 exactly, so the median is
                // the value of rank ceil(n / 2) - 1, which a selection finds without the sort.
                const int32_t rank = (n + 1) / 2 - 1;
                if (HasNonFinite(q, n)) {
                    SortAscending(q, n);
                } else {
                    std::nth_element(q, q + rank, q + n);
                }
                b = clampTo(1, q[rank]);
            }
            line[0][0] = a, line[0][1] = b;
            LineValues(x, n, a, b, f);
            current = MeanAbsResidual(y, f, vw, n);
            ++passes;
        }
    }
    if (count != nullptr) *count = passes;
    const Pick p = Choose(current, prev, mae0);
    const int32_t c = p == Pick::Latest ? 0 : p == Pick::Before ? 1 : 2;
    *slope = line[c][0];
    *intercept = line[c][1];
    if (mae != nullptr) *mae = c == 0 ? current : c == 1 ? prev : mae0;
    if (fit != nullptr) LineValues(x, n, line[c][0], line[c][1], fit);
    return work.Release();
}

// --- The nonlinear models -----------------------------------------------------------------------

namespace {

int32_t ParamCount(RobustModel m) { return m == RobustModel::Gauss ? 3 : 2; }

double ModelValue(RobustModel m, const double* p, double base, double x) {
    switch (m) {
        case RobustModel::Exp:
            return p[0] * std::exp(p[1] * x);
        case RobustModel::Power:
            return p[0] * std::pow(x, p[1]);
        case RobustModel::Log:
            return p[0] * LogBase(x * p[1], base);
        case RobustModel::Gauss:
            break;
    }
    const double u = (x - p[1]) / p[2];
    return p[0] * std::exp(-0.5 * (u * u));
}

void ModelValues(RobustModel m, const double* p, double base, const double* x, int32_t n, double* f) {
    for (int32_t i = 0; i < n; ++i) f[i] = ModelValue(m, p, base, x[i]);
}

int32_t Scaled(int32_t limit, int32_t factor) {
    const int64_t v = static_cast<int64_t>(limit) * factor;
    return static_cast<int32_t>(std::clamp<int64_t>(v, INT32_MIN, INT32_MAX));
}

// One fit of the model by its least-squares core; only the parameters are produced.
Status InnerFit(const RobustModelInputs& in, const double* x, const double* y, const double* w, int32_t n,
                const double* guess, double tolerance, int32_t limit, double floor, double* p) {
    int32_t it = limit;
    const IterationInputs ii{tolerance, floor, &it};
    switch (in.model) {
        case RobustModel::Exp:
            return ExpFitCore(x, y, w, n, in.method, guess, ii, p, p + 1, nullptr, nullptr);
        case RobustModel::Power:
            return PowerFitCore(x, y, w, n, guess, ii, p, p + 1, nullptr, nullptr);
        case RobustModel::Log:
            return LogFitCore(x, y, w, n, in.base, p, p + 1, nullptr, nullptr);
        case RobustModel::Gauss:
            break;
    }
    return GaussianPeakFitCore(x, y, w, n, guess, ii, p, p + 1, p + 2, nullptr, nullptr);
}

// Jacobian rows of the model at p into j (n by ParamCount).
void ModelJacobian(RobustModel m, const double* p, const double* x, int32_t n, double* j) {
    for (int32_t i = 0; i < n; ++i) {
        if (m == RobustModel::Exp) {
            const double e = std::exp(p[1] * x[i]);
            j[2 * i] = e;
            j[2 * i + 1] = p[0] * x[i] * e;
        } else if (m == RobustModel::Power) {
            const double e = std::pow(x[i], p[1]);
            j[2 * i] = e;
            j[2 * i + 1] = p[0] * e * std::log(x[i]);
        } else {
            const double v = x[i] - p[1], u = v / p[2];
            const double e = std::exp(-0.5 * (u * u));
            const double t = p[0] * v * e / (p[2] * p[2]);
            j[3 * i] = e;
            j[3 * i + 1] = t;
            j[3 * i + 2] = t * v / p[2];
        }
    }
}

Status BisquareModel(const double* x, const double* y, const double* vw, int32_t n,
                     const RobustModelInputs& in, double* p, double* f, double* work, int32_t* count) {
    const int32_t np = ParamCount(in.model);
    const bool gauss = in.model == RobustModel::Gauss;
    const double tol = IterationTolerance(in.tolerance);
    double* adj = work;
    double* r = adj + n;
    double* rw = r + n;
    double* j = rw + n;  // n by np
    if (in.model == RobustModel::Log) {
        // A fixed design: the leverage is taken once.
        const double sign = x[0] > 0 ? 1.0 : -1.0;
        for (int32_t i = 0; i < n; ++i) j[2 * i] = LogBase(sign * x[i], in.base), j[2 * i + 1] = 1.0;
        if (const Status s = LeverageAdjust(j, vw, n, 2, true, adj)) return s;
    }
    double prev[3];
    for (int32_t i = 0; i < np; ++i) prev[i] = p[i] + kFirstPassOffset;
    int32_t passes = 0;
    for (;;) {
        if (passes > 0) {
            bool settled = passes >= in.limit;
            for (int32_t i = 0; i < np; ++i)
                settled = settled || std::fabs(prev[i] - p[i]) <= std::fabs(prev[i]) * tol;
            if (settled) break;
        }
        std::copy(p, p + np, prev);
        if (in.model != RobustModel::Log) {
            ModelJacobian(in.model, p, x, n, j);
            if (const Status s = LeverageAdjust(j, vw, n, np, !gauss, adj)) return s;
        }
        ModelValues(in.model, p, in.base, x, n, f);
        for (int32_t i = 0; i < n; ++i) r[i] = (y[i] - f[i]) * adj[i];
        int32_t zeros = 0;
        bool exact = false;
        if (const Status s = BisquarePass(r, vw, n, rw, &zeros, &exact)) return s;
        if (exact || zeros >= n - (gauss ? 2 : 1)) break;
        Status s = 0;
        switch (in.model) {
            case RobustModel::Exp:
            case RobustModel::Power:
                s = InnerFit(in, x, y, rw, n, nullptr, -1.0, 50, in.floor, p);
                break;
            case RobustModel::Log:
                s = InnerFit(in, x, y, rw, n, nullptr, 0, 0, 0, p);
                break;
            case RobustModel::Gauss:
                s = InnerFit(in, x, y, rw, n, nullptr, 1e-08, 300, in.floor, p);
                break;
        }
        if (s < 0) return s;
        ++passes;
    }
    *count = passes;
    return 0;
}

Status LarModel(const double* x, const double* y, const double* vw, int32_t n, const RobustModelInputs& in,
                double* p, double* f, double* work, double* err, int32_t* count) {
    const int32_t np = ParamCount(in.model);
    const double tol = IterationTolerance(in.tolerance), fl = MseFloor(in.floor);
    const int32_t limit = in.model == RobustModel::Gauss ? Scaled(in.limit, 5) : in.limit;
    double* r = work;
    double* v = r + n;
    double sets[3][3];  // latest, before, start
    std::copy(p, p + np, sets[0]);
    std::copy(p, p + np, sets[1]);
    std::copy(p, p + np, sets[2]);
    ModelValues(in.model, p, in.base, x, n, f);
    const double mae0 = MeanAbsResidual(y, f, vw, n);
    double prev = 2 * mae0, current = mae0;
    int32_t passes = 0;
    if (in.limit > 0) {
        while (passes < in.limit) {
            if (std::fabs(prev - current) <= prev * tol || current <= fl || prev <= current) break;
            prev = current;
            std::copy(sets[0], sets[0] + np, sets[1]);
            if (const Status s = InverseResidualWeights(y, f, vw, n, r, v)) return s;
            const Status s = InnerFit(in, x, y, v, n, sets[1], in.tolerance, limit, -1.0, sets[0]);
            if (s < 0) return s;
            ModelValues(in.model, sets[0], in.base, x, n, f);
            current = MeanAbsResidual(y, f, vw, n);
            ++passes;
        }
    }
    *count = passes;
    const Pick pick = Choose(current, prev, mae0);
    const int32_t c = pick == Pick::Latest ? 0 : pick == Pick::Before ? 1 : 2;
    std::copy(sets[c], sets[c] + np, p);
    *err = c == 0 ? current : c == 1 ? prev : mae0;
    return 0;
}

}  // namespace

Status RobustModelFit(const double* x, const double* y, const double* w, int32_t n, RobustModelInputs in,
                      double* p, double* fit, double* err, int32_t* count) {
    const bool lar = in.kind == RobustKind::Lar;
    // The plain exponential fit silently writes nothing for an unknown method; a loop around it
    // would run on unset parameters, so the robust fits refuse it.
    if (in.model == RobustModel::Exp && (in.method < 0 || in.method > 1)) return InvalidSelectorErr;
    // The start fit vets the data and the weights in its own order.
    Status st = 0;
    switch (in.model) {
        case RobustModel::Exp:
        case RobustModel::Power:
            st = lar ? InnerFit(in, x, y, w, n, in.guess, in.tolerance, in.limit, -1.0, p)
                     : InnerFit(in, x, y, w, n, in.guess, -1.0, 100, in.floor, p);
            break;
        case RobustModel::Log:
            st = InnerFit(in, x, y, w, n, nullptr, 0, 0, 0, p);
            break;
        case RobustModel::Gauss:
            st = lar ? InnerFit(in, x, y, w, n, in.guess, in.tolerance, Scaled(in.limit, 10), -1.0, p)
                     : InnerFit(in, x, y, w, n, in.guess, -1.0, 500, in.floor, p);
            break;
    }
    if (st < 0) return st;
    const double* vw = nullptr;
    if (const Status s = VetWeights(w, n, in.model == RobustModel::Gauss ? 2 : 1, &vw)) return s;
    Scratch<double> work;
    const int32_t np = ParamCount(in.model);
    if (work.Allocate(static_cast<size_t>(n) * (4 + static_cast<size_t>(np))) != 0) return OutOfMemoryErr;
    double* f = work.get();
    double e = 0;
    int32_t passes = 0;
    Status s = lar ? LarModel(x, y, vw, n, in, p, f, f + n, &e, &passes)
                   : BisquareModel(x, y, vw, n, in, p, f, f + n, &passes);
    if (s < 0) return s;
    if (count != nullptr) *count = passes;
    ModelValues(in.model, p, in.base, x, n, f);
    if (!lar) e = FitMse(y, f, vw, n, MseWalk::Forward);
    if (err != nullptr) *err = e;
    if (fit != nullptr) std::memcpy(fit, f, static_cast<size_t>(n) * sizeof(double));
    return MergeRelease(st, work.Release());
}

}  // namespace tw
