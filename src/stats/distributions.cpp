#include "stats/distributions.hpp"

#include <cmath>
#include <limits>

#include "special/gamma.hpp"

namespace tw {

namespace {

constexpr double kInf = std::numeric_limits<double>::infinity();
constexpr double kWidth = 0.0001;

// Written as a pair of comparisons so that a NaN probability passes, unreported, and yields
// whatever the computation makes of it.
bool OutsideUnit(double p) { return p < 0.0 || p > 1.0; }

double TCdf(double t, double df) {
    const double v = std::fabs(t);
    double r = v == 0.0 ? 1.0 : IncBeta(0.5 * df, 0.5, df / (v * v + df));
    r = r * 0.5;
    return t < 0.0 ? r : 1.0 - r;
}

double FCdf(double f, double d1, double d2) {
    if (f <= 0.0) return 0.0;
    return 1.0 - IncBeta(0.5 * d2, 0.5 * d1, d2 / (d1 * f + d2));
}

double ChiCdf(double x, double df) { return x <= 0.0 ? 0.0 : IncGamma(0.5 * df, 0.5 * x); }

// Halves [lo, hi] until it is at most kWidth wide; rises(mid) tells whether mid becomes the new
// lower end. The lower end is the result, so the returned quantile never lies above the true one
// by more than the CDF's own error allows.
template <class Rises>
double Bisect(double lo, double hi, Rises rises) {
    while (hi - lo > kWidth) {
        const double mid = 0.5 * (lo + hi);
        if (rises(mid))
            lo = mid;
        else
            hi = mid;
    }
    return lo;
}

}  // namespace

double NormalCdf(double x) {
    const double v = std::fabs(x);
    const double u = 1.0 / (1.0 + 0.33267 * v);
    const double q = ((0.937298 * u - 0.1201676) * u + 0.4361836) * std::exp(-0.5 * v * v) * 0.3989422 * u;
    return x < 0.0 ? q : 1.0 - q;
}

Status NormalQuantile(double p, double* x) {
    if (OutsideUnit(p)) return ProbabilityRangeErr;
    if (p == 0.0) {
        *x = -kInf;
        return 0;
    }
    if (p == 1.0) {
        *x = kInf;
        return 0;
    }
    const auto r = [](double w) {
        return ((0.010328 * w + 0.802853) * w + 2.515517) /
               (((0.001308 * w + 0.189269) * w + 1.432788) * w + 1.0);
    };
    if (p >= 0.5) {
        const double w = std::sqrt(-2.0 * std::log(1.0 - p));
        *x = w - r(w);
    } else {
        const double w = std::sqrt(-2.0 * std::log(p));
        *x = r(w) - w;
    }
    return 0;
}

Status StudentTCdf(double t, int32_t df, double* p) {
    if (df < 1) return SampleCountErr;
    if (std::isnan(t)) return BoundsNanErr;
    *p = TCdf(t, df);
    return 0;
}

Status FisherCdf(double f, int32_t numeratorDf, int32_t denominatorDf, double* p) {
    if (numeratorDf < 1 || denominatorDf < 1) return SampleCountErr;
    if (std::isnan(f)) return BoundsNanErr;
    *p = FCdf(f, numeratorDf, denominatorDf);
    return 0;
}

double FisherCdfValue(double f, int32_t numeratorDf, int32_t denominatorDf) {
    return FCdf(f, numeratorDf, denominatorDf);
}

Status ChiSquareCdf(double x, int32_t df, double* p) {
    // 0 degrees pass here and reach the incomplete gamma function with a = 0.
    if (df < 0) return SampleCountErr;
    *p = ChiCdf(x, df);
    return 0;
}

Status StudentTQuantile(double p, int32_t df, double* t) {
    if (df < 1) return SampleCountErr;
    if (OutsideUnit(p)) return ProbabilityRangeErr;
    if (p == 0.0 || p == 1.0) {
        *t = p == 0.0 ? -kInf : kInf;
        return 0;
    }
    // A quantile beyond the fixed bracket ends at its top.
    *t = Bisect(-10000.0, 10000.0, [&](double mid) { return !(p <= TCdf(mid, df)); });
    return 0;
}

Status FisherQuantile(double p, int32_t numeratorDf, int32_t denominatorDf, double* f) {
    if (numeratorDf < 1 || denominatorDf < 1) return SampleCountErr;
    if (OutsideUnit(p)) return ProbabilityRangeErr;
    if (p == 0.0 || p == 1.0) {
        *f = p == 0.0 ? 0.0 : kInf;
        return 0;
    }
    // Below F(1e-6) the lower end never moves: the result is 1e-6, not 0.
    *f = Bisect(1e-6, 10000.0, [&](double mid) { return !(p <= FCdf(mid, numeratorDf, denominatorDf)); });
    return 0;
}

Status ChiSquareQuantile(double p, int32_t df, double* x) {
    if (OutsideUnit(p)) return ProbabilityRangeErr;
    if (df < 1) return SampleCountErr;
    if (p == 0.0 || p == 1.0) {
        *x = p == 0.0 ? 0.0 : kInf;
        return 0;
    }
    double upper = 5000.0;
    while (ChiCdf(upper, df) < p) upper += 5000.0;
    *x = Bisect(0.0, upper, [&](double mid) { return ChiCdf(mid, df) < p; });
    return 0;
}

}  // namespace tw
