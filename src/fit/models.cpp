// The exponential, power, logarithm and Gaussian peak models.
#include <algorithm>
#include <cmath>
#include <cstring>

#include "fit/fit_core.hpp"
#include "matrix/matrix_core.hpp"

namespace tw {

namespace {

constexpr double kLnLiteral = 2.71828;  // the base that selects ln (not e itself)

// Exponential a exp(b x) and power a x^b share estimate and refinement.
enum class TwoParam { Exp, Power };

double Basis(TwoParam m, double b, double x) { return m == TwoParam::Exp ? std::exp(b * x) : std::pow(x, b); }
double Abscissa(TwoParam m, double x) { return m == TwoParam::Exp ? x : std::log(x); }

// Model values into f and their mse against y; with a design given, the basis values go into its
// first column for the next step.
double TwoParamMse(TwoParam m, const double* x, const double* y, const double* w, int32_t n, double a, double b,
                   double* f, double* design = nullptr) {
    for (int32_t i = 0; i < n; ++i) {
        const double e = Basis(m, b, x[i]);
        f[i] = a * e;
        if (design != nullptr) design[2 * static_cast<size_t>(i)] = e;
    }
    return FitMse(y, f, w, n, MseWalk::Model);
}

// Dominant sign of y: -1 if more negative than positive elements.
double DominantSign(const double* y, int32_t n) {
    int32_t balance = 0;
    for (int32_t i = 0; i < n; ++i) balance += (y[i] > 0) - (y[i] < 0);
    return balance < 0 ? -1.0 : 1.0;
}

// Line through ln(s y) against x (or ln x) over the samples of the dominant sign, weighted y^2.
// block holds 4n values.
Status LogLinearEstimate(TwoParam m, const double* x, const double* y, const double* w, int32_t n, double sign,
                         double* block, double* c) {
    double* wt = block;
    double* t = block + n;
    double* h = block + 2 * static_cast<size_t>(n);
    int32_t rows = 0;
    for (int32_t i = 0; i < n; ++i) {
        if (!(sign * y[i] > 0)) continue;
        t[rows] = std::log(sign * y[i]);
        h[2 * rows] = 1.0;
        h[2 * rows + 1] = Abscissa(m, x[i]);
        wt[rows] = w != nullptr ? std::fabs(w[i] * y[i] * y[i]) : y[i] * y[i];
        ++rows;
    }
    return GeneralLeastSquares(h, rows, 2, t, wt, 0, c, nullptr, nullptr, nullptr);
}

// Undamped Gauss-Newton from (a, b), keeping the best record. Returns the count through *steps.
// block holds 5n values: model values, right-hand side, the n by 2 design, the abscissae.
Status GaussNewton(TwoParam m, const double* x, const double* y, const double* w, int32_t n, IterationInputs it,
                   int32_t limit, double* block, double* a, double* b, int32_t* steps) {
    double* f = block;
    double* r = block + n;
    double* h = block + 2 * static_cast<size_t>(n);
    double* t = block + 4 * static_cast<size_t>(n);
    for (int32_t i = 0; i < n; ++i) t[i] = Abscissa(m, x[i]);
    const double tol = IterationTolerance(it.tolerance), floor = MseFloor(it.floor);
    double mse = TwoParamMse(m, x, y, w, n, *a, *b, f, h);
    double bestA = *a, bestB = *b, bestMse = mse, prev = 2 * mse;
    int32_t count = 0;
    if (limit >= 0) {
        while (std::fabs(prev - mse) > prev * tol && mse > floor) {
            prev = mse;
            // The first column already holds the basis at the current b.
            for (int32_t i = 0; i < n; ++i) {
                const double e = h[2 * i];
                h[2 * i + 1] = *a * e * t[i];
                r[i] = y[i] - *a * e;
            }
            double d[2];
            const Status st = GeneralLeastSquares(h, n, 2, r, w, 0, d, nullptr, nullptr, nullptr);
            if (st < 0) return st;
            *a += d[0];
            *b += d[1];
            mse = TwoParamMse(m, x, y, w, n, *a, *b, f, h);
            ++count;
            if (!std::isfinite(mse)) break;
            if (count > limit / 10 && mse > prev && mse > bestMse) break;  // diverging
            if (mse < bestMse) bestA = *a, bestB = *b, bestMse = mse;
            if (count > limit) break;
        }
    }
    *a = bestA;
    *b = bestB;
    *steps = count;
    return 0;
}

// Fitted values and mse of the final parameters; fit may be y.
void WriteFit(TwoParam m, const double* x, const double* y, const double* w, int32_t n, double a, double b,
            double* block, double* fit, double* mse) {
    if (fit == nullptr && mse == nullptr) return;
    const double e = TwoParamMse(m, x, y, w, n, a, b, block);
    if (mse != nullptr) *mse = e;
    if (fit != nullptr) std::memcpy(fit, block, static_cast<size_t>(n) * sizeof(double));
}

Status TwoParamFit(TwoParam m, const double* x, const double* y, const double* w, int32_t n, int32_t method,
                   const double* guess, IterationInputs it, double* a, double* b, double* fit, double* mse) {
    if (n < 2) return TooFewSamples2Err;
    const double* vw = nullptr;
    if (const Status s = VetWeights(w, n, 1, &vw)) return s;
    if (m == TwoParam::Power)
        for (int32_t i = 0; i < n; ++i)
            if (x[i] <= 0) return BadDataRangeErr;
    const double sign = DominantSign(y, n);
    const bool badGuess = guess != nullptr && HasNonFinite(guess, 2) != 0;
    Scratch<double> block;
    if (block.Allocate(5 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double c[2] = {0, 0};
    if (method == 0 || guess == nullptr || badGuess) {
        const Status st = LogLinearEstimate(m, x, y, vw, n, sign, block.get(), c);
        if (st < 0) return MergeRelease(st, block.Release());
    }
    double pa, pb;
    if (method == 0) {
        pa = sign * std::exp(c[0]);
        pb = c[1];
    } else if (method == 1) {
        // A present guess is the start even when it failed the screen: the loop then stops on
        // the non-finite mse.
        pa = guess != nullptr ? guess[0] : sign * std::exp(c[0]);
        pb = guess != nullptr ? guess[1] : c[1];
        const int32_t limit = it.iterations != nullptr ? *it.iterations : 0;
        int32_t steps = 0;
        const Status st = GaussNewton(m, x, y, vw, n, it, limit, block.get(), &pa, &pb, &steps);
        if (st < 0) return MergeRelease(st, block.Release());
        if (it.iterations != nullptr) *it.iterations = steps;
    } else {
        return block.Release();
    }
    *a = pa;
    *b = pb;
    WriteFit(m, x, y, vw, n, pa, pb, block.get(), fit, mse);
    return block.Release();
}

double Gaussian(double a, double c, double s, double x) {
    const double u = (x - c) / s;
    return a * std::exp(-0.5 * (u * u));
}

double GaussianMse(const double* x, const double* y, const double* w, int32_t n, double a, double c, double s,
                   double* f) {
    for (int32_t i = 0; i < n; ++i) f[i] = Gaussian(a, c, s, x[i]);
    return FitMse(y, f, w, n, MseWalk::Model);
}

// Closed form through the peak and its nearest neighbours of the peak's sign.
Status ThreePoint(const double* x, const double* y, int32_t n, int32_t peak, double* a, double* c, double* s) {
    const bool positive = y[peak] > 0;
    const auto ofSign = [&](int32_t i) { return positive ? y[i] > 0 : y[i] < 0; };
    int32_t left = peak - 1, right = peak + 1;
    while (left >= 0 && !ofSign(left)) --left;
    while (right < n && !ofSign(right)) ++right;
    if (left < 0 || right >= n) return ZeroAmplitudeErr;
    const double v[6] = {x[left], y[left], x[peak], y[peak], x[right], y[right]};
    if (HasNonFinite(v, 6)) return ZeroAmplitudeErr;
    const double x1 = v[0], y1 = v[1], x2 = v[2], y2 = v[3], x3 = v[4], y3 = v[5];
    const double l1 = std::log(y1 / y2), l3 = std::log(y3 / y2);
    const double r = ((x2 - x3) / (x2 - x1)) * (l1 / l3);
    *c = ((((x3 + x2) * r - x1) - x2) / (r - 1)) * 0.5;
    *s = std::sqrt((((x2 - x1) * ((x1 + x2) - 2 * *c)) / l1) * 0.5);
    const double d = x1 - *c;
    *a = y1 / std::exp(-0.5 * (((d * d) / *s) / *s));
    return 0;
}

// Start values from the shape of the peak; *threePoint when only the peak stands out.
Status PeakEstimate(const double* x, const double* y, int32_t n, double* a, double* c, double* s, bool* threePoint) {
    int32_t peak = 0;
    for (int32_t i = 1; i < n; ++i)
        if (std::fabs(y[i]) > std::fabs(y[peak])) peak = i;
    *a = y[peak];
    *c = x[peak];
    double s1 = 0, s2 = 0;
    int32_t m = 0;
    for (int32_t i = 0; i < n; ++i) {
        if (y[i] == 0 || !(std::fabs(y[i]) > 0.1 * std::fabs(*a))) continue;
        const double q = *a / y[i];
        s1 += std::log(q * q);
        const double d = x[i] - *c;
        s2 += d * d;
        ++m;
    }
    *threePoint = m == 1;
    if (m == 1) return ThreePoint(x, y, n, peak, a, c, s);
    if (s1 == 0) {
        // A flat top: every counted sample equals the peak.
        double lo = x[peak], hi = x[peak];
        for (int32_t i = 0; i < n; ++i)
            if (y[i] == y[peak]) lo = std::min(lo, x[i]), hi = std::max(hi, x[i]);
        *a = *a * 1.2;
        *c = (hi + lo) * 0.5;
        *s = std::sqrt(hi - lo);
    } else {
        *s = std::sqrt(s2 / s1);
    }
    return 0;
}

}  // namespace

Status ExpFitCore(const double* x, const double* y, const double* w, int32_t n, int32_t method, const double* guess,
                  IterationInputs it, double* a, double* b, double* fit, double* mse) {
    return TwoParamFit(TwoParam::Exp, x, y, w, n, method, guess, it, a, b, fit, mse);
}

Status PowerFitCore(const double* x, const double* y, const double* w, int32_t n, const double* guess,
                    IterationInputs it, double* a, double* b, double* fit, double* mse) {
    return TwoParamFit(TwoParam::Power, x, y, w, n, 1, guess, it, a, b, fit, mse);
}

double LogBase(double v, double base) {
    if (base == kLnLiteral) return std::log(v);
    if (base == 10) return std::log10(v);
    return std::log(v) / std::log(base);
}

Status LogFitCore(const double* x, const double* y, const double* w, int32_t n, double base, double* a, double* b,
                  double* fit, double* mse) {
    if (!(base > 0)) return BadDataRangeErr;
    if (n < 2) return TooFewSamples2Err;
    const double* vw = nullptr;
    if (const Status s = VetWeights(w, n, 1, &vw)) return s;
    int32_t positive = 0, negative = 0;
    for (int32_t i = 0; i < n; ++i) positive += x[i] > 0, negative += x[i] < 0;
    if (positive != n && negative != n) return NonPositiveDataErr;
    const double sign = positive == n ? 1.0 : -1.0;
    Scratch<double> block;
    if (block.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* t = block.get();
    for (int32_t i = 0; i < n; ++i) t[i] = LogBase(sign * x[i], base);
    double slope = 0, constant = 0;
    Status st = LineFit(t, y, vw, n, &slope, &constant, nullptr, nullptr);
    if (st < 0) return MergeRelease(st, block.Release());
    *a = slope;
    *b = slope == 0 ? sign : sign * (base == kLnLiteral ? std::exp(constant / slope) : std::pow(base, constant / slope));
    if (fit != nullptr || mse != nullptr) {
        for (int32_t i = 0; i < n; ++i) t[i] = *a * LogBase(x[i] * *b, base);
        const double e = FitMse(y, t, vw, n, MseWalk::Model);
        if (mse != nullptr) *mse = e;
        if (fit != nullptr) std::memcpy(fit, t, static_cast<size_t>(n) * sizeof(double));
    }
    return MergeRelease(st, block.Release());
}

Status GaussianPeakFitCore(const double* x, const double* y, const double* w, int32_t n, const double* guess,
                           IterationInputs it, double* a, double* c, double* s, double* fit, double* mse) {
    if (n < 3) return TooFewSamples3Err;
    const double* vw = nullptr;
    if (const Status st = VetWeights(w, n, 2, &vw)) return st;
    for (int32_t i = 0; i < n; ++i)
        if (!std::isfinite(x[i])) return NanInfErr;
    Scratch<double> block;
    if (block.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* f = block.get();
    double pa, pc, ps, reported;
    bool threePoint = false;
    if (guess != nullptr && HasNonFinite(guess, 3) == 0) {
        pa = guess[0], pc = guess[1], ps = guess[2];
    } else if (const Status st = PeakEstimate(x, y, n, &pa, &pc, &ps, &threePoint)) {
        return MergeRelease(st, block.Release());
    }
    if (threePoint) {
        reported = GaussianMse(x, y, vw, n, pa, pc, ps, f);
        if (it.iterations != nullptr) *it.iterations = 0;
    } else {
        if (ps == 0) return MergeRelease(ZeroAmplitudeErr, block.Release());
        const double tol = IterationTolerance(it.tolerance), floor = MseFloor(it.floor);
        const int32_t limit = it.iterations != nullptr ? *it.iterations : 0;
        double mse0 = GaussianMse(x, y, vw, n, pa, pc, ps, f);
        const double startA = pa, startC = pc, startS = ps, startMse = mse0;
        double cur = mse0, prev = cur + 1.0, step = 1.0, g[3] = {0, 0, 0};
        bool recompute = true;
        int32_t count = 0;
        if (limit >= 0) {
            do {
                if (std::fabs(prev - cur) <= prev * tol || cur <= floor) break;
                if (recompute) {
                    prev = cur;
                    g[0] = g[1] = g[2] = 0;
                    const double ss = ps * ps;
                    for (int32_t i = 0; i < n; ++i) {
                        const double v = x[i] - pc, u = v / ps;
                        const double e = std::exp(-0.5 * (u * u));
                        const double r = y[i] - pa * e;
                        const double q = vw != nullptr ? std::fabs(vw[i]) : 1.0;
                        const double t = q * r * pa * v * e / ss;
                        g[0] += q * r * e;
                        g[1] += t;
                        g[2] += t * v / ps;
                    }
                }
                const double ta = pa + g[0] * step, tc = pc + g[1] * step, ts = ps + g[2] * step;
                cur = GaussianMse(x, y, vw, n, ta, tc, ts, f);
                if (prev < cur) {
                    // The step only ever shrinks.
                    step *= 0.5;
                    recompute = false;
                } else {
                    pa = ta, pc = tc, ps = ts;
                    recompute = true;
                }
                ++count;
            } while (count <= limit);
        }
        if (it.iterations != nullptr) *it.iterations = count;
        // The last computed mse is reported, a rejected trial's included.
        reported = cur;
        if (!(startMse > cur) && !(startMse > prev)) pa = startA, pc = startC, ps = startS, reported = startMse;
    }
    ps = std::fabs(ps);
    *a = pa;
    *c = pc;
    *s = ps;
    if (fit != nullptr)
        for (int32_t i = n - 1; i >= 0; --i) fit[i] = Gaussian(pa, pc, ps, x[i]);
    if (mse != nullptr) *mse = reported;
    return block.Release();
}

}  // namespace tw
