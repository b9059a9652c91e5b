// Bounded fits: the constrained Levenberg-Marquardt solver and its models, start estimates,
// replication of short data, the bounded logarithm and the penalised-Newton line.
#include "fit/bounded.hpp"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>

#include "fit/robust.hpp"
#include "matrix/decompose.hpp"
#include "matrix/matrix_core.hpp"
#include "stats/descriptive.hpp"

namespace tw {

namespace {

constexpr double kUnitRound = 2.220446049250313e-16;
constexpr double kInf = std::numeric_limits<double>::infinity();
constexpr int32_t kMaxP = 4;
constexpr int32_t kLineGuard = 10000;  // quiet cap on the penalised line's loops

size_t Cells(int32_t rows, int32_t cols) { return static_cast<size_t>(rows) * static_cast<size_t>(cols); }

// --- Models -------------------------------------------------------------------------------------

double ExpValue(double x, const double* q, const void*) { return q[0] * std::exp(q[1] * x) + q[2]; }
void ExpGradient(double x, const double* q, const void*, double* g) {
    const double e = std::exp(q[1] * x);
    g[0] = e;
    g[1] = q[0] * x * e;
    g[2] = 1.0;
}
double PowerValue(double x, const double* q, const void*) { return q[0] * std::pow(x, q[1]) + q[2]; }
void PowerGradient(double x, const double* q, const void*, double* g) {
    const double e = std::pow(x, q[1]);
    g[0] = e;
    g[1] = q[0] * e * std::log(x);
    g[2] = 1.0;
}
double GaussValue(double x, const double* q, const void*) {
    const double u = (x - q[1]) / q[2];
    return q[0] * std::exp(-0.5 * (u * u)) + q[3];
}
void GaussGradient(double x, const double* q, const void*, double* g) {
    const double u = (x - q[1]) / q[2];
    const double e = std::exp(-0.5 * (u * u));
    g[0] = e;
    g[1] = q[0] * e * u / q[2];
    g[2] = g[1] * u;
    g[3] = 1.0;
}
// ctx: {base, ln base}; ln base is 1 where the log model takes ln itself.
double LogValue(double x, const double* q, const void* ctx) {
    return q[0] * LogBase(x * q[1], static_cast<const double*>(ctx)[0]);
}
void LogGradient(double x, const double* q, const void* ctx, double* g) {
    const double* c = static_cast<const double*>(ctx);
    g[0] = LogBase(x * q[1], c[0]);
    g[1] = q[0] / (q[1] * c[1]);
}

// alpha, beta and mse over all samples from a value-and-gradient entry.
template <int P, double (*Value)(double, const double*, const void*),
          void (*Gradient)(double, const double*, const void*, double*)>
void Batch(const double* x, const double* y, const double* v, int32_t n, const double* q, const void* ctx,
           double* alpha, double* beta, double* mse) {
    double a[P * P] = {}, b[P] = {}, sum = 0, g[P];
    for (int32_t i = 0; i < n; ++i) {
        const double r = y[i] - Value(x[i], q, ctx);
        Gradient(x[i], q, ctx, g);
        const double wt = v != nullptr ? std::fabs(v[i]) : 1.0;
        sum += r * r * wt;
        for (int j = 0; j < P; ++j) {
            const double t = g[j] * wt;
            for (int k = 0; k <= j; ++k) a[j * P + k] += t * g[k];
            b[j] += t * r;
        }
    }
    for (int j = 0; j < P; ++j)
        for (int k = 0; k < P; ++k) alpha[j * P + k] = k <= j ? a[j * P + k] : a[k * P + j];
    std::copy(b, b + P, beta);
    *mse = sum / n;
}

// --- Solver -------------------------------------------------------------------------------------

// The gradient of the model at x, by the model's own entry or by central differences.
void GradientAt(const LmModel& m, double x, double* q, double* g) {
    if (m.gradient != nullptr) {
        m.gradient(x, q, m.ctx, g);
        return;
    }
    for (int32_t j = 0; j < m.p; ++j) {
        const double keep = q[j];
        const double h = 3e-06 * std::max(std::fabs(keep), std::sqrt(kUnitRound));
        q[j] = keep + h;
        const double up = m.value(x, q, m.ctx);
        q[j] = keep - h;
        const double down = m.value(x, q, m.ctx);
        q[j] = keep;
        g[j] = (up - down) / (2 * h);
    }
}

struct LmWork {
    double* f;
    double* j;  // n by p
    double* adj;
    double* r;
    double* v;
    double* kw;  // the bisquare kind's standing weights
};

void PlainEvaluate(const LmModel& m, const double* x, const double* y, const double* v, int32_t n, double* q,
                   double* alpha, double* beta, double* mse) {
    if (m.batch != nullptr) {
        m.batch(x, y, v, n, q, m.ctx, alpha, beta, mse);
        return;
    }
    const int32_t p = m.p;
    std::fill(alpha, alpha + Cells(p, p), 0.0);
    std::fill(beta, beta + p, 0.0);
    double sum = 0, g[kMaxP];
    for (int32_t i = 0; i < n; ++i) {
        const double r = y[i] - m.value(x[i], q, m.ctx);
        GradientAt(m, x[i], q, g);
        const double wt = v != nullptr ? std::fabs(v[i]) : 1.0;
        sum += r * r * wt;
        for (int32_t a = 0; a < p; ++a) {
            const double t = g[a] * wt;
            for (int32_t b = 0; b <= a; ++b) alpha[Cells(a, p) + b] += t * g[b];
            beta[a] += t * r;
        }
    }
    for (int32_t a = 0; a < p; ++a)
        for (int32_t b = a + 1; b < p; ++b) alpha[Cells(a, p) + b] = alpha[Cells(b, p) + a];
    *mse = sum / n;
}

// alpha, beta and the objective E of the error kind at q.
Status Evaluate(const LmModel& m, uint16_t kind, const double* x, const double* y, const double* w, int32_t n,
                double* q, const LmWork& wk, double* alpha, double* beta, double* e) {
    if (kind == BoundLeastSquares) {
        PlainEvaluate(m, x, y, w, n, q, alpha, beta, e);
        return 0;
    }
    for (int32_t i = 0; i < n; ++i) wk.f[i] = m.value(x[i], q, m.ctx);
    if (kind == BoundLeastAbsolute) {
        if (const Status s = InverseResidualWeights(y, wk.f, w, n, wk.r, wk.v)) return s;
        PlainEvaluate(m, x, y, wk.v, n, q, alpha, beta, e);
        *e = MeanAbsResidual(y, wk.f, w, n);
        return 0;
    }
    for (int32_t i = 0; i < n; ++i) GradientAt(m, x[i], q, wk.j + Cells(i, m.p));
    // Leverage times |w| only for the two-parameter model, as in the robust fits.
    if (const Status s = LeverageAdjust(wk.j, w, n, m.p, m.p == 2, wk.adj)) return s;
    for (int32_t i = 0; i < n; ++i) wk.r[i] = (y[i] - wk.f[i]) * wk.adj[i];
    int32_t zeros = 0;
    bool exact = false;
    if (const Status s = BisquarePass(wk.r, nullptr, n, wk.v, &zeros, &exact)) return s;
    if (!exact && zeros <= n - m.p)
        for (int32_t i = 0; i < n; ++i) wk.kw[i] = w != nullptr ? wk.v[i] * std::fabs(w[i]) : wk.v[i];
    PlainEvaluate(m, x, y, wk.kw, n, q, alpha, beta, e);
    return 0;
}

// Clamp into the box, lower bound first, and record the states (0 free, 1 lower, 2 upper).
void Clamp(double* q, const double* lower, const double* upper, int32_t p, int32_t* state) {
    for (int32_t j = 0; j < p; ++j) {
        if (q[j] <= lower[j]) {
            q[j] = lower[j];
            state[j] = 1;
        } else if (q[j] >= upper[j]) {
            q[j] = upper[j];
            state[j] = 2;
        } else {
            state[j] = 0;
        }
    }
}

void Mask(double* alpha, double* beta, const int32_t* state, int32_t p) {
    for (int32_t j = 0; j < p; ++j) {
        if (state[j] == 0) continue;
        for (int32_t k = 0; k < p; ++k) alpha[Cells(j, p) + k] = alpha[Cells(k, p) + j] = 0.0;
        alpha[Cells(j, p) + j] = 1.0;
        if ((state[j] == 1 && beta[j] < 0) || (state[j] == 2 && beta[j] > 0)) beta[j] = 0.0;
    }
}

// Solves the damped system; a non-finite system or solution is a zero step (*nonFinite set).
Status DampedSolve(const double* alpha, const double* beta, int32_t p, double lambda, double* delta,
                   bool* nonFinite) {
    double a[kMaxP * kMaxP], b[kMaxP];
    int32_t perm[kMaxP], parity = 0;
    std::memcpy(a, alpha, Cells(p, p) * sizeof(double));
    std::memcpy(b, beta, static_cast<size_t>(p) * sizeof(double));
    for (int32_t j = 0; j < p; ++j) {
        double& d = a[Cells(j, p) + j];
        d = (lambda + 1) * d + lambda;
    }
    *nonFinite = HasNonFinite(a, p * p) != 0;
    if (*nonFinite) return 0;
    Status s = LuFactor<double>(a, p, p, perm, &parity);
    if (s == SingularPivotWarn) s = SingularMatrixErr;
    if (s == 0) s = LuSolve<double>(a, perm, b, p, delta);
    if (s == 0 && HasNonFinite(delta, p)) *nonFinite = true;
    return s;
}

}  // namespace

Status LevenbergMarquardt(const double* x, const double* y, const double* w, int32_t n, uint16_t kind,
                          const LmModel& model, double* q, const double* upper, const double* lower,
                          int32_t* iterations, double tolerance, double* lambda, double* fit, double* err) {
    const int32_t p = model.p;
    if (n < 1) return EmptyArrayErr;
    if (n < p) return PolyOrderErr;
    if (kind > BoundBisquare) return InvalidSelectorErr;
    if (q == nullptr) return EmptyArrayErr;
    for (int32_t j = 0; j < p; ++j)
        if (upper[j] < lower[j]) return BoundsOrderErr;
    int32_t state[kMaxP], trialState[kMaxP];
    Clamp(q, lower, upper, p, state);
    const double tol = tolerance > 0 ? tolerance : 1e-08;
    double lam = *lambda > 0 ? *lambda : 1.0;
    Scratch<double> work;
    if (work.Allocate(static_cast<size_t>(n) * (5 + static_cast<size_t>(p))) != 0) return OutOfMemoryErr;
    const LmWork wk{work.get(),
                    work.get() + n,
                    work.get() + n * (1 + static_cast<size_t>(p)),
                    work.get() + n * (2 + static_cast<size_t>(p)),
                    work.get() + n * (3 + static_cast<size_t>(p)),
                    work.get() + n * (4 + static_cast<size_t>(p))};
    for (int32_t i = 0; i < n; ++i) wk.kw[i] = w != nullptr ? std::fabs(w[i]) : 1.0;
    double alpha[kMaxP * kMaxP], beta[kMaxP], alpha2[kMaxP * kMaxP], beta2[kMaxP], trial[kMaxP], delta[kMaxP];
    double e = 0, e2 = 0;
    if (const Status s = Evaluate(model, kind, x, y, w, n, q, wk, alpha, beta, &e)) return s;
    Mask(alpha, beta, state, p);
    const int32_t limit = iterations != nullptr ? *iterations : 0;
    Status st = 0;
    int32_t count = 0;
    for (;;) {
        if (limit >= 0 && count > limit) break;
        bool nonFinite = false;
        if (const Status s = DampedSolve(alpha, beta, p, lam, delta, &nonFinite)) {
            st = s;
            break;
        }
        if (nonFinite) std::fill(delta, delta + p, 0.0);
        for (int32_t j = 0; j < p; ++j) trial[j] = q[j] + delta[j];
        Clamp(trial, lower, upper, p, trialState);
        if (kind == BoundBisquare) {
            double change = 0;
            for (int32_t j = 0; j < p; ++j)
                change = std::max(change, std::fabs(q[j] - trial[j]) / std::fabs(q[j]));
            if (change <= tol) break;
        }
        if (const Status s = Evaluate(model, kind, x, y, w, n, trial, wk, alpha2, beta2, &e2)) {
            st = s;
            break;
        }
        Mask(alpha2, beta2, trialState, p);
        if (e2 > e || std::isnan(e2)) {
            if (!std::isfinite(e) && !std::isfinite(e2)) {
                st = NanInfErr;
                break;
            }
            lam *= 10;
            if (lam > 10000) break;
        } else {
            const bool converged = e - e2 < e * tol;
            std::copy(trial, trial + p, q);
            std::copy(trialState, trialState + p, state);
            std::copy(alpha2, alpha2 + Cells(p, p), alpha);
            std::copy(beta2, beta2 + p, beta);
            e = e2;
            if (converged) break;
            lam *= 0.4;
            if (limit >= 0 && count == limit) {
                st = NoConvergenceErr;
                break;
            }
        }
        ++count;
    }
    *lambda = lam;
    if (iterations != nullptr) *iterations = count;
    if (st < 0 && st != NoConvergenceErr) return st;
    if (kind == BoundBisquare) PlainEvaluate(model, x, y, w, n, q, alpha, beta, &e);
    if (err != nullptr) *err = e;
    if (fit != nullptr)
        for (int32_t i = 0; i < n; ++i) fit[i] = model.value(x[i], q, model.ctx);
    return MergeRelease(st, work.Release());
}

LmModel BoundedModel(BoundModel m) {
    switch (m) {
        case BoundModel::Exp:
            return {3, ExpValue, ExpGradient, Batch<3, ExpValue, ExpGradient>, nullptr};
        case BoundModel::Power:
            return {3, PowerValue, PowerGradient, Batch<3, PowerValue, PowerGradient>, nullptr};
        case BoundModel::Gauss:
            break;
    }
    return {4, GaussValue, GaussGradient, Batch<4, GaussValue, GaussGradient>, nullptr};
}

LmModel BoundedLogModel(const double* baseAndLog) {
    return {2, LogValue, LogGradient, Batch<2, LogValue, LogGradient>, baseAndLog};
}

// --- Start estimates ----------------------------------------------------------------------------

namespace {

// Offset from the vertex of a parabola through (t, y), then a log-linear exponential in t on y
// less that offset: q = (a, b, c). Both fits take the caller's weights, so that samples of
// weight 0 do not steer the start either.
Status ExpLikeEstimate(const double* t, const double* y, const double* w, int32_t n, double* q) {
    Scratch<double> work;
    if (work.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double c[3];
    Status s = PolyFitCore(t, y, w, n, 2, 0, {nullptr, nullptr, 0}, PolyLeastSquares, kPlainTuning, c,
                           nullptr, nullptr);
    if (s < 0) return s;
    double offset = 0;
    if (std::isfinite(c[2]) && !(std::fabs(c[2]) <= kUnitRound)) offset = c[0] - c[1] * c[1] / (4 * c[2]);
    double* reduced = work.get();
    for (int32_t i = 0; i < n; ++i) reduced[i] = y[i] - offset;
    int32_t it = 50;
    s = ExpFitCore(t, reduced, w, n, 0, nullptr, {0.0001, 1e-12, &it}, q, q + 1, nullptr, nullptr);
    if (s < 0) return s;
    q[2] = offset;
    return work.Release();
}

// One Gaussian candidate from the first histogram bin holding more than a tenth of the samples,
// walking up (peak) or down (dip); refined by the Gaussian core on y less the offset.
bool GaussCandidate(const double* x, const double* y, int32_t n, const int32_t* counts, const double* centres,
                    double halfBin, bool peak, double* work, double* q, double* mse) {
    int32_t bin = -1;
    for (int32_t k = 0; k < 10 && bin < 0; ++k) {
        const int32_t b = peak ? k : 9 - k;
        if (counts[b] > n / 10) bin = b;
    }
    if (bin < 0) return false;
    const double o = centres[bin];
    int32_t at = 0;
    for (int32_t i = 1; i < n; ++i)
        if (peak ? y[i] > y[at] : y[i] < y[at]) at = i;
    const double m = x[at];
    double dl = std::fabs(m - x[0]), dr = std::fabs(x[n - 1] - m);
    for (int32_t i = 0; i < n; ++i) {
        if (!(y[i] > o - halfBin && y[i] < o + halfBin)) continue;
        if (x[i] < m) dl = std::min(dl, m - x[i]);
        if (x[i] > m) dr = std::min(dr, x[i] - m);
    }
    const double start[3] = {y[at] - o, m, std::max(dl, dr) * 0.5};
    for (int32_t i = 0; i < n; ++i) work[i] = y[i] - o;
    int32_t it = 20;
    double a = 0, c = 0, s = 0, e = 0;
    if (GaussianPeakFitCore(x, work, nullptr, n, start, {0.0001, 0.0001, &it}, &a, &c, &s, nullptr, &e) < 0 ||
        !std::isfinite(e))
        return false;
    q[0] = a, q[1] = c, q[2] = s, q[3] = o;
    *mse = e;
    return true;
}

Status GaussEstimate(const double* x, const double* y, const double* w, int32_t n, double* q) {
    Scratch<double> work;
    if (work.Allocate(3 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* xs = work.get();
    double* ys = xs + n;
    double* scratch = ys + n;
    int32_t m = 0;
    for (int32_t i = 0; i < n; ++i)
        if (w == nullptr || w[i] != 0) xs[m] = x[i], ys[m++] = y[i];
    int32_t counts[10];
    double centres[10];
    if (const Status s = DataHistogram(ys, m, 10, counts, centres)) return s;
    const double halfBin = (centres[1] - centres[0]) * 0.5;
    double qp[4], qd[4], ep = 0, ed = 0;
    const bool okPeak = GaussCandidate(xs, ys, m, counts, centres, halfBin, true, scratch, qp, &ep);
    const bool okDip = GaussCandidate(xs, ys, m, counts, centres, halfBin, false, scratch, qd, &ed);
    if (!okPeak && !okDip) return NoPeakFoundErr;
    const double* best = okPeak && (!okDip || ep <= ed) ? qp : qd;
    std::copy(best, best + 4, q);
    if (q[2] == 0) return ZeroAmplitudeErr;
    return work.Release();
}

int32_t FreeCount(const double* lower, const double* upper, int32_t p) {
    int32_t k = 0;
    for (int32_t j = 0; j < p; ++j) k += lower[j] != upper[j];
    return k;
}

// NaN or infinity is NanInfErr; all zero means unweighted; more than n - p zeros is degenerate.
Status VetBoundWeights(const double* w, int32_t n, int32_t p, const double** vetted) {
    *vetted = nullptr;
    if (w == nullptr) return 0;
    int32_t zeros = 0;
    for (int32_t i = 0; i < n; ++i) {
        if (!std::isfinite(w[i])) return NanInfErr;
        zeros += w[i] == 0;
    }
    if (zeros == n) return 0;
    if (zeros > n - p) return DegenerateDataErr;
    *vetted = w;
    return 0;
}

// Short data repeated so that the solver sees at least p samples: one sample p times, two or
// three twice. Returns the new count.
int32_t Replicate(const double* x, const double* y, const double* w, int32_t n, int32_t p, double* rx,
                  double* ry, double* rw) {
    const int32_t times = n == 1 ? p : 2;
    for (int32_t t = 0; t < times; ++t)
        for (int32_t i = 0; i < n; ++i) {
            rx[t * n + i] = x[i];
            ry[t * n + i] = y[i];
            if (w != nullptr) rw[t * n + i] = w[i];
        }
    return n * times;
}

void StartFromBounds(const double* lower, const double* upper, int32_t p, double* q) {
    for (int32_t j = 0; j < p; ++j) q[j] = upper[j] != kInf ? upper[j] : lower[j] != -kInf ? lower[j] : 0.0;
}

}  // namespace

Status BoundedModelFit(BoundModel model, const double* x, const double* y, const double* w, int32_t n,
                       double tolerance, int32_t iterations, const double* guess, const double* lower,
                       const double* upper, uint16_t kind, double* q, double* fit, double* mse) {
    const LmModel lm = BoundedModel(model);
    const int32_t p = lm.p;
    if (n < FreeCount(lower, upper, p)) return TooFewDataForModelErr;
    if (n == 0) {
        std::copy(upper, upper + p, q);
        *mse = 0;
        return 0;
    }
    const double tol = tolerance > 0 ? tolerance : 0.0001;
    if (kind > BoundBisquare) return InvalidSelectorErr;
    if (model == BoundModel::Power)
        for (int32_t i = 0; i < n; ++i)
            if (x[i] <= 0) return BadDataRangeErr;
    const double* vw = nullptr;
    if (const Status s = VetBoundWeights(w, n, std::min(p, n), &vw)) return s;
    const int32_t l1 = std::max(1, std::min(20, iterations / 2));
    const int32_t l2 = std::max(1, iterations - std::min(20, iterations / 2));
    Scratch<double> work;
    const int32_t m = n < p ? (n == 1 ? p : 2 * n) : n;
    if (work.Allocate(3 * static_cast<size_t>(m) + static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    const double *sx = x, *sy = y, *sw = vw;
    if (n < p) {
        Replicate(x, y, vw, n, p, work.get(), work.get() + m, work.get() + 2 * m);
        sx = work.get(), sy = work.get() + m, sw = vw != nullptr ? work.get() + 2 * m : nullptr;
    }
    if (guess != nullptr) {
        std::copy(guess, guess + p, q);
    } else if (n < p) {
        StartFromBounds(lower, upper, p, q);  // no estimate on fewer samples than parameters
    } else if (model == BoundModel::Gauss) {
        if (const Status s = GaussEstimate(x, y, vw, n, q)) return s;
    } else {
        double* t = work.get() + 3 * static_cast<size_t>(m);
        for (int32_t i = 0; i < n; ++i) t[i] = model == BoundModel::Exp ? x[i] : std::log(x[i]);
        if (const Status s = ExpLikeEstimate(t, y, vw, n, q)) return s;
    }
    double none[2][kMaxP];
    std::fill(none[0], none[0] + kMaxP, -kInf);
    std::fill(none[1], none[1] + kMaxP, kInf);
    int32_t it = l1;
    double lambda = 0.1, e = 0;
    Status st = LevenbergMarquardt(sx, sy, sw, m, BoundLeastSquares, lm, q, none[1], none[0], &it,
                                   std::sqrt(tol), &lambda, nullptr, &e);
    if (st < 0 && st != NoConvergenceErr) return st;
    it = l2;
    lambda = 0.1;
    st = LevenbergMarquardt(sx, sy, sw, m, kind, lm, q, upper, lower, &it, tol, &lambda, nullptr, &e);
    if (st < 0 && st != NoConvergenceErr) return st;
    if (fit != nullptr)
        for (int32_t i = 0; i < n; ++i) fit[i] = lm.value(x[i], q, nullptr);
    *mse = e;
    return MergeRelease(st, work.Release());
}

Status BoundedLogFit(const double* x, const double* y, const double* w, int32_t n, double tolerance,
                     int32_t iterations, const double* lower, const double* upper, uint16_t kind, double base,
                     double* q, double* fit, double* mse) {
    if (n < FreeCount(lower, upper, 2)) return TooFewDataForModelErr;
    if (n == 0) {
        std::copy(upper, upper + 2, q);
        *mse = 0;
        return 0;
    }
    if (kind > BoundBisquare) return InvalidSelectorErr;
    const double* vw = nullptr;
    if (const Status s = VetBoundWeights(w, n, std::min(2, n), &vw)) return s;
    int32_t positive = 0, negative = 0;
    for (int32_t i = 0; i < n; ++i) positive += x[i] > 0, negative += x[i] < 0;
    if (positive != n && negative != n) return NonPositiveDataErr;
    Scratch<double> work;
    const int32_t m = n == 1 ? 2 : n;
    if (work.Allocate(3 * static_cast<size_t>(m)) != 0) return OutOfMemoryErr;
    const double *sx = x, *sy = y, *sw = vw;
    if (n == 1) {
        Replicate(x, y, vw, n, 2, work.get(), work.get() + m, work.get() + 2 * m);
        sx = work.get(), sy = work.get() + m, sw = vw != nullptr ? work.get() + 2 * m : nullptr;
    }
    double e = 0;
    Status st;
    if (kind == BoundLeastSquares) {
        st = LogFitCore(sx, sy, sw, m, base, q, q + 1, nullptr, &e);
    } else {
        int32_t count = 0;
        const RobustModelInputs in{RobustModel::Log,
                                   kind == BoundBisquare ? RobustKind::Bisquare : RobustKind::Lar,
                                   0,
                                   nullptr,
                                   base,
                                   tolerance,
                                   1e-12,
                                   iterations};
        st = RobustModelFit(sx, sy, sw, m, in, q, nullptr, &e, &count);
    }
    if (st < 0) return st;
    const bool inside = q[0] >= lower[0] && q[0] <= upper[0] && q[1] >= lower[1] && q[1] <= upper[1];
    if (!inside) {
        const double context[2] = {base, base == 2.71828 ? 1.0 : std::log(base)};
        const LmModel lm = BoundedLogModel(context);
        int32_t it = iterations;
        double lambda = 1.0;
        st = LevenbergMarquardt(sx, sy, sw, m, kind, lm, q, upper, lower, &it, tolerance, &lambda, nullptr,
                                &e);
        if (st < 0 && st != NoConvergenceErr) return st;
    }
    if (fit != nullptr)
        for (int32_t i = 0; i < n; ++i) fit[i] = q[0] * LogBase(x[i] * q[1], base);
    *mse = e;
    return MergeRelease(st, work.Release());
}

// --- Bounded straight line ----------------------------------------------------------------------

Status BoundedLine(const double* x, const double* y, const double* w, int32_t n, const LineBounds& bd,
                   double* slope, double* intercept, double* fit, double* mse) {
    const double* lo = bd.lower;
    const double* up = bd.upper;
    if (n < FreeCount(lo, up, 2)) return TooFewDataForModelErr;
    if (n == 0) {
        *slope = up[0];
        *intercept = up[1];
        if (mse != nullptr) *mse = 0;
        return 0;
    }
    // One sample: a second point that pins what the bounds leave open.
    double px[2], py[2];
    const double* sx = x;
    const double* sy = y;
    const double* sw = w;
    int32_t m = n;
    if (n == 1) {
        px[0] = x[0], py[0] = y[0], px[1] = x[0] + 1;
        if (lo[0] == up[0] && lo[1] == up[1])
            py[1] = px[1] * up[0] + up[1];
        else if (lo[0] == up[0])
            py[1] = y[0] + up[0];
        else if (x[0] == 0)
            py[1] = y[0] + 1;
        else
            py[1] = (px[1] * y[0] - up[1]) / x[0];
        sx = px, sy = py, sw = nullptr, m = 2;
    }
    const double* vw = nullptr;
    if (const Status s = VetWeights(sw, m, 1, &vw)) return s;
    if (lo[0] > up[0] || lo[1] > up[1]) return BoundsOrderErr;
    double top = 0;
    if (vw != nullptr)
        for (int32_t i = 0; i < m; ++i) top = std::max(top, std::fabs(vw[i]));
    double s = 0, sxs = 0, sxx = 0, sys = 0, sxy = 0;
    for (int32_t i = 0; i < m; ++i) {
        const double v = vw != nullptr ? std::fabs(vw[i]) / top : 1.0;
        s += v;
        sxs += v * sx[i];
        sys += v * sy[i];
        sxy += v * sx[i] * sy[i];
        sxx += v * sx[i] * sx[i];
    }
    double a = 0, b = 0;
    if (const Status st = LineFit(sx, sy, vw, m, &a, &b, nullptr, nullptr)) return st;
    if (a > up[0] || a < lo[0] || b > up[1] || b < lo[1]) {
        const auto objective = [&](double p, double q) {
            return 0.5 * sxx * p * p + 0.5 * s * q * q + sxs * p * q - sxy * p - sys * q;
        };
        const double g = std::sqrt(kUnitRound);
        a = std::clamp(a, lo[0], up[0]);
        b = std::clamp(b, lo[1], up[1]);
        double f = objective(a, b);
        double mu = std::max(f / 1.414, 1.0);
        double rel = 0;
        int32_t outer = 0;
        // A parameter clamped at its bound has zero room and stays there: the penalty wall
        // holds it, so two violated bounds end at the corner.
        do {
            double p = 1 / (g + std::min(up[0] - a, a - lo[0]));
            double q = 1 / (g + std::min(up[1] - b, b - lo[1]));
            mu /= 10;
            double fnew = f;
            for (int32_t inner = 0; inner < kLineGuard; ++inner) {
                const double aa = p * p * mu + sxx, bb = q * q * mu + s;
                const double g1 = -(a * sxx - sxy + b * sxs), g2 = -(b * s + a * sxs - sys);
                const double d = sxs * sxs - aa * bb;
                const double da = (g2 * sxs - g1 * bb) / d, db = (g1 * sxs - g2 * aa) / d;
                a = std::clamp(a + da, lo[0], up[0]);
                b = std::clamp(b + db, lo[1], up[1]);
                fnew = objective(a, b);
                const double room = std::min(std::min(up[0] - a, a - lo[0]), std::min(up[1] - b, b - lo[1]));
                mu *= 2;
                if (!(g + std::min(room, f - fnew) < 0)) break;
                p = da, q = db;  // the repeat works with the last step in their place
            }
            rel = std::fabs(f - fnew) / (std::fabs(f) + kUnitRound);
            f = fnew;
        } while (rel > 1e-12 && ++outer < kLineGuard);
    }
    *slope = a;
    *intercept = b;
    if (fit != nullptr || mse != nullptr) {
        // The caller's weights over the real samples (a single one is taken as it is).
        const double* cw = w;
        if (n > 1) VetWeights(w, n, 1, &cw);
        double sum = 0;
        for (int32_t i = 0; i < n; ++i) {
            const double fi = x[i] * a + b, r = y[i] - fi;
            sum += cw != nullptr ? r * r * std::fabs(cw[i]) : r * r;
            if (fit != nullptr) fit[i] = fi;
        }
        if (mse != nullptr) *mse = sum / n;
    }
    return 0;
}

Status DampedStep(double* coef, const double* alpha, const double* beta, int32_t k, double lambda) {
    Scratch<double> work;
    Scratch<int32_t> perm;
    if (work.Allocate(Cells(k, k) + 2 * static_cast<size_t>(k)) != 0 ||
        perm.Allocate(static_cast<size_t>(k)) != 0)
        return OutOfMemoryErr;
    double* a = work.get();
    double* b = a + Cells(k, k);
    double* delta = b + k;
    std::memcpy(a, alpha, Cells(k, k) * sizeof(double));
    std::memcpy(b, beta, static_cast<size_t>(k) * sizeof(double));
    for (int32_t j = 0; j < k; ++j) a[Cells(j, k) + j] *= lambda + 1;
    if (HasNonFinite(a, k * k)) return NanInfErr;
    int32_t parity = 0;
    Status s = LuFactor<double>(a, k, k, perm.get(), &parity);
    if (s == SingularPivotWarn) s = SingularMatrixErr;
    if (s == 0) s = LuSolve<double>(a, perm.get(), b, k, delta);
    if (s != 0) return s;
    for (int32_t j = 0; j < k; ++j) {
        coef[j] += delta[j];
        if (std::isnan(coef[j])) s = SingularMatrixErr;
    }
    return MergeRelease(s, MergeRelease(work.Release(), perm.Release()));
}

}  // namespace tw
