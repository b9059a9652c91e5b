// Confidence and prediction bounds: one procedure over the models' values and Jacobian rows.
#include "fit/bounds.hpp"

#include <algorithm>
#include <cmath>

#include "fit/fit_core.hpp"
#include "matrix/solve.hpp"
#include "stats/distributions.hpp"

namespace tw {

namespace {

constexpr double kLnLiteral = 2.71828;  // the base that selects ln, as in the fitting cores

size_t Cells(int32_t rows, int32_t cols) { return static_cast<size_t>(rows) * static_cast<size_t>(cols); }

// Each model writes its Jacobian row at x, in the parameter order of the fit, and returns its
// value there. The values are formed as the fitting cores form them.
struct LineModel {
    double slope, intercept;
    double Row(double x, double* j) const {
        j[0] = 1.0;  // the intercept leads in J, though the slope leads among the arguments
        j[1] = x;
        return x * slope + intercept;
    }
};

struct ExpModel {
    double a, b;
    double Row(double x, double* j) const {
        const double e = std::exp(b * x);
        j[0] = e;
        j[1] = a * x * e;
        return a * e;
    }
};

struct PowerModel {
    double a, b;
    double Row(double x, double* j) const {
        const double q = std::pow(x, b);
        j[0] = q;
        j[1] = a * q * std::log(x);  // x <= 0 makes G non-finite: the pseudo-inverse screens it
        return a * q;
    }
};

struct LogModel {
    double a, b, base, slope;  // slope: the derivative in b times x, constant
    LogModel(double pa, double pb, double pbase)
        : a(pa), b(pb), base(pbase), slope(pbase == kLnLiteral ? pa / pb : pa / (pb * std::log(pbase))) {}
    double Row(double x, double* j) const {
        const double l = LogBase(b * x, base);
        j[0] = l;
        j[1] = slope;
        return a * l;
    }
};

struct GaussModel {
    double a, c, s;
    double Row(double x, double* j) const {
        const double z = (x - c) / s;
        const double e = std::exp(-0.5 * (z * z));
        j[0] = e;
        j[1] = a * z * e / s;
        j[2] = a * z * z * e / s;
        return a * e;
    }
};

// Vandermonde row by repeated multiplication, value by Horner's rule from the highest power.
struct PolyModel {
    const double* coef;
    int32_t k;
    double Row(double x, double* j) const {
        j[0] = 1.0;
        for (int32_t i = 1; i < k; ++i) j[i] = j[i - 1] * x;
        double f = coef[k - 1];
        for (int32_t i = k - 2; i >= 0; --i) f = f * x + coef[i];
        return f;
    }
};

// Jacobian rows into jac (n by p) and model values into f; G = sum |w| J^T J unless g is null.
// Returns the residual sum of the expanded terms ((f - 2y) f + y y) |w|, not yet divided.
template <class Model>
double Rows(const Model& m, int32_t p, const double* x, const double* y, const double* w, int32_t n,
            double* jac, double* f, double* g) {
    double sum = 0;
    if (g != nullptr) std::fill(g, g + Cells(p, p), 0.0);
    for (int32_t i = 0; i < n; ++i) {
        double* j = jac + Cells(i, p);
        const double v = m.Row(x[i], j);
        f[i] = v;
        const double term = (v - 2 * y[i]) * v + y[i] * y[i];
        const double aw = w != nullptr ? std::fabs(w[i]) : 1.0;
        sum += w != nullptr ? term * aw : term;
        if (g == nullptr) continue;
        for (int32_t r = 0; r < p; ++r) {
            const double t = w != nullptr ? j[r] * aw : j[r];
            double* gr = g + Cells(r, p);
            for (int32_t c = r; c < p; ++c) gr[c] += t * j[c];
        }
    }
    if (g != nullptr)
        for (int32_t r = 0; r < p; ++r)
            for (int32_t c = 0; c < r; ++c) g[Cells(r, p) + c] = g[Cells(c, p) + r];
    return sum;
}

// The common procedure. svdCovariance: C from the SVD of the sqrt|w|-scaled Jacobian without a
// cut-off (the polynomial confidence band; the least-squares core takes it through the triangle of
// a QR reduction, which has the same singular values and right vectors), else the pseudo-inverse
// of G at the default tolerance. f goes into upper first. deltaJ (p, in J order) may be null.
template <class Model>
Status Bands(const Model& m, int32_t p, bool svdCovariance, const double* x, const double* y, const double* w,
             int32_t n, double level, bool prediction, double* upper, double* lower, double* deltaJ) {
    Scratch<double> work;
    if (work.Allocate(Cells(n, p) + 2 * Cells(p, p) + static_cast<size_t>(p)) != 0) return OutOfMemoryErr;
    double* jac = work.get();
    double* g = jac + Cells(n, p);
    double* c = g + Cells(p, p);
    double* coef = c + Cells(p, p);
    const double sum = Rows(m, p, x, y, w, n, jac, upper, svdCovariance ? nullptr : g);
    Status st = svdCovariance ? GeneralLeastSquares(jac, n, p, y, w, 0, coef, c, nullptr, nullptr)
                              : PseudoInverse<double>(g, p, p, -1.0, c);
    const int32_t dof = n - p;
    const double s2 = sum / dof;
    double t = 0;
    if (st == 0) st = StudentTQuantile(1 - (1 - level) * 0.5, dof, &t);
    if (st != 0) return MergeRelease(st, work.Release());
    for (int32_t i = 0; i < n; ++i) {
        const double* j = jac + Cells(i, p);
        double q = 0;
        for (int32_t r = 0; r < p; ++r) {
            const double* cr = c + Cells(r, p);
            double v = 0;
            for (int32_t k = 0; k < p; ++k) v += cr[k] * j[k];
            q += j[r] * v;
        }
        double d;
        if (!prediction)
            d = std::sqrt(q * s2) * t;
        else if (w == nullptr)
            d = std::sqrt((q + 1) * s2) * t;
        else
            d = std::sqrt((q + 1 / std::fabs(w[i])) * s2) * t;
        const double f = upper[i];
        upper[i] = f + d;
        lower[i] = f - d;
    }
    if (deltaJ != nullptr) {
        for (int32_t r = 0; r < p; ++r) {
            const double cjj = c[Cells(r, p) + r];
            deltaJ[r] = svdCovariance ? std::sqrt(cjj * s2) * t : std::sqrt(cjj) * t * std::sqrt(s2);
        }
    }
    return work.Release();
}

}  // namespace

Status FitBoundsCore(const BoundModelParams& m, const double* x, const double* y, const double* w, int32_t n,
                     double level, bool prediction, double* upper, double* lower, double* upperParams,
                     double* lowerParams, double* delta) {
    const bool poly = m.kind == BoundModel::Poly;
    const int32_t p = poly ? m.count : BoundParameterCount(m.kind);
    if (poly) {
        if (!(p < n)) return PolyOrderErr;
        if (p < 1) return EmptyArrayErr;
    } else if (m.kind == BoundModel::Gauss) {
        if (n < 4) return TooFewSamples4Err;
    } else if (n < 3) {
        return TooFewSamples3Err;
    }
    // A NaN base is no positive base either.
    if (m.kind == BoundModel::Log && !(m.base > 0)) return BadDataRangeErr;
    const double* v = m.params;
    for (int32_t j = 0; j < p; ++j)
        if (!std::isfinite(v[j])) return NanInfErr;
    if (m.kind == BoundModel::Gauss && v[2] == 0) return ZeroAmplitudeErr;
    if (poly && w != nullptr)
        for (int32_t i = 0; i < n; ++i)
            if (!std::isfinite(w[i])) return NanInfErr;
    if (!(level > 0 && level < 1)) return ProbabilityRangeErr;

    Scratch<double> deltas;
    const bool wantDelta =
        !prediction && (upperParams != nullptr || lowerParams != nullptr || delta != nullptr);
    if (wantDelta && deltas.Allocate(static_cast<size_t>(p)) != 0) return OutOfMemoryErr;
    double* dj = wantDelta ? deltas.get() : nullptr;
    Status st = 0;
    switch (m.kind) {
        case BoundModel::Line:
            st = Bands(LineModel{v[0], v[1]}, p, false, x, y, w, n, level, prediction, upper, lower, dj);
            break;
        case BoundModel::Exp:
            st = Bands(ExpModel{v[0], v[1]}, p, false, x, y, w, n, level, prediction, upper, lower, dj);
            break;
        case BoundModel::Power:
            st = Bands(PowerModel{v[0], v[1]}, p, false, x, y, w, n, level, prediction, upper, lower, dj);
            break;
        case BoundModel::Log:
            st = Bands(LogModel(v[0], v[1], m.base), p, false, x, y, w, n, level, prediction, upper, lower,
                       dj);
            break;
        case BoundModel::Gauss:
            st = Bands(GaussModel{v[0], v[1], v[2]}, p, false, x, y, w, n, level, prediction, upper, lower,
                       dj);
            break;
        case BoundModel::Poly:
            st = Bands(PolyModel{v, p}, p, !prediction, x, y, w, n, level, prediction, upper, lower, dj);
            break;
    }
    if (st == 0 && dj != nullptr) {
        for (int32_t j = 0; j < p; ++j) {
            // The line's arguments are (slope, intercept), its J (intercept, slope).
            const double d = m.kind == BoundModel::Line ? dj[1 - j] : dj[j];
            if (upperParams != nullptr) upperParams[j] = v[j] + d;
            if (lowerParams != nullptr) lowerParams[j] = v[j] - d;
            if (delta != nullptr) delta[j] = d;
        }
    }
    return MergeRelease(st, deltas.Release());
}

}  // namespace tw
