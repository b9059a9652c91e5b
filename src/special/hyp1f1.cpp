// Kummer's function M(a, b, x) = 1F1(a; b; x): the power series, the same series after Kummer's
// transformation e^x M(b - a, b, -x), and the asymptotic expansion through two 2F0 series, each
// with an error estimate; the first estimate below the tolerance wins. After Cephes `hyperg`,
// with an uncapped power series and the Kummer route added.
#include <cmath>

#include "special/bessel.hpp"
#include "special/gamma.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

constexpr double kLargest = 1.7976931348623157e308;
constexpr double kTolerance = 1.8334264312505186e-11;
constexpr double kLooseBest = 0.0001220703125;  // 2^-13
constexpr double kLooseKummer = 0.00048828125;  // 2^-11
// The series has no fixed term cap (one truncates I_2.7(80)); this guard only stops a runaway
// loop and counts as failure.
constexpr double kSafetyTerms = 1.0e6;

// Power series; *err estimates roundoff and cancellation relative to the sum (1: failed).
double PowerSeries(double a, double b, double x, double* err) {
    double an = a, bn = b, term = 1.0, sum = 1.0, n = 1.0, maxt = 0.0;
    for (;;) {
        if (bn == 0.0) {
            SpecialReport(SpecialFunction::Hyp1F1, SpecialFault::Pole);
            *err = 0.0;
            return kInf;
        }
        if (an == 0.0) break;  // the series terminates
        if (n > kSafetyTerms) {
            *err = 1.0;
            return sum;
        }
        const double u = x * (an / (bn * n));
        const double size = std::fabs(u);
        if (size > 1.0 && maxt > kLargest / size) {
            *err = 1.0;  // the terms overflow
            return sum;
        }
        term *= u;
        sum += term;
        const double t = std::fabs(term);
        if (t > maxt) maxt = t;
        an += 1.0;
        bn += 1.0;
        n += 1.0;
        // Stop on a small term only where no later term can grow again: past the sign changes of
        // a + n and b + n and with shrinking terms (before b + n crosses 0 they jump back up).
        if (an > 0.0 && bn > 0.0 && size < 1.0 && !(t > kEps * std::fabs(sum))) break;
        if (IsNaN(t)) {
            *err = 1.0;
            return sum;
        }
    }
    if (sum != 0.0) maxt /= std::fabs(sum);
    maxt *= kEps;  // so as not to overflow the product
    *err = std::fabs(kEps * n + maxt);
    if (IsNaN(*err)) *err = 1.0;
    return sum;
}

// The asymptotic series 2F0(a, b; ; x), cut where its terms start to grow, with the published
// converging factors (kind 1 and 2) applied to the last term.
double Hyp2F0(double a, double b, double x, int kind, double* err) {
    double an = a, bn = b, a0 = 1.0, alast = 1.0, sum = 0.0, n = 1.0, t = 1.0, tlast = 1.0e9,
           maxt = 0.0;
    bool converged = true;
    do {
        if (an == 0.0 || bn == 0.0) break;
        const double u = an * (bn * x / n);
        const double size = std::fabs(u);
        if (size > 1.0 && maxt > kLargest / size) {
            SpecialReport(SpecialFunction::Hyp1F1, SpecialFault::Precision);
            *err = 1.0e38;
            return sum;
        }
        a0 *= u;
        t = std::fabs(a0);
        if (t > tlast) {
            converged = false;
            break;
        }
        tlast = t;
        sum += alast;  // the sum runs one term behind
        alast = a0;
        if (n > 200.0) {
            converged = false;
            break;
        }
        an += 1.0;
        bn += 1.0;
        n += 1.0;
        if (t > maxt) maxt = t;
    } while (t > kEps);
    if (converged) {
        *err = std::fabs(kEps * (n + maxt));
        alast = a0;
    } else {
        n -= 1.0;
        const double xi = 1.0 / x;
        if (kind == 1)
            alast *= (0.5 + (0.125 + 0.25 * b - 0.5 * a + 0.25 * xi - 0.25 * n) / xi);
        else if (kind == 2)
            alast *= 2.0 / 3.0 - b + 2.0 * a + xi - n;
        *err = kEps * (n + maxt) + std::fabs(a0);
    }
    return sum + alast;
}

double Asymptotic(double a, double b, double x, double* err) {
    double lx = std::log(std::fabs(x));
    double t = x + lx * (a - b);
    double u = -lx * a;
    if (b > 0.0) {
        const double lg = LnGammaFunc(b);
        t += lg;
        u += lg;
    }
    double err1, err2;
    double h1 = Hyp2F0(a, a - b + 1.0, -1.0 / x, 1, &err1);
    double scale = std::exp(u) / GammaFunc(b - a);
    h1 *= scale;
    err1 *= scale;
    double h2 = Hyp2F0(b - a, 1.0 - a, 1.0 / x, 2, &err2);
    scale = a < 0.0 ? std::exp(t) / GammaFunc(a) : std::exp(t - LnGammaFunc(a));
    h2 *= scale;
    err2 *= scale;
    double sum = x < 0.0 ? h1 : h2;
    double e = std::fabs(err1) + std::fabs(err2);
    if (b < 0.0) {
        const double g = GammaFunc(b);
        sum *= g;
        e *= std::fabs(g);
    }
    // An overflowing exponential factor is the answer, not an error: M itself overflows.
    if (!IsFinite(sum) && !IsNaN(sum)) {
        *err = 0.0;
        return sum;
    }
    if (sum != 0.0) e /= std::fabs(sum);
    *err = 30.0 * e;  // the published allowance: the expansion errs more than its terms say
    if (IsNaN(*err)) *err = 1.0;
    return sum;
}

}  // namespace

double Hyp1F1(double a, double b, double x) {
    if (IsNaN(a) || IsNaN(b) || IsNaN(x)) return kNaN;
    if (!IsFinite(a) || !IsFinite(b) || !IsFinite(x)) {
        if (!IsFinite(a) && !IsFinite(b) && (a > 0.0) == (b > 0.0)) return std::exp(x);
        if (!IsFinite(b) && IsFinite(a) && IsFinite(x)) return 1.0;
        if (IsPosInf(a) && IsFinite(b) && IsFinite(x) && x != 0.0) return kInf;
        return kNaN;
    }
    if (a == 0.0 || x == 0.0) return 1.0;
    if (b == a) return std::exp(x);

    double e1, e2, e3;
    const double s1 = PowerSeries(a, b, x, &e1);
    if (e1 < kTolerance) return s1;
    double s2 = PowerSeries(b - a, b, -x, &e2);
    s2 *= std::exp(x);
    if (e2 < kTolerance) return s2;
    const double s3 = Asymptotic(a, b, x, &e3);
    if (e3 < kTolerance) return s3;

    double best = s1, eb = e1;
    if (e2 < eb) {
        best = s2;
        eb = e2;
    }
    if (e3 < eb) {
        best = s3;
        eb = e3;
    }
    if (eb < kLooseBest) return best;
    if (e2 < kLooseKummer) return s2;
    SpecialReport(SpecialFunction::Hyp1F1, SpecialFault::Precision);
    return kNaN;
}

}  // namespace tw
