// Gauss's hypergeometric function 2F1(a, b; c; x) after Cephes `hyp2f1` (its transformations,
// the psi expansion near x = 1 and the recurrence on c), and Tricomi's confluent function
// U(a, b, x): the asymptotic series for large x, two Kummer functions with gammas below, and an
// integral where either would lose the answer.
#include <cmath>

#include "special/bessel.hpp"
#include "special/gamma.hpp"
#include "special/gamma_weighted_integral.hpp"
#include "special/special2.hpp"
#include "special/special2_tables.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

constexpr double kIntegerTol = 1.8334264312505186e-11;  // an order counts as an integer
constexpr double kGapTol = 3.7252902984619132e-09;      // c - a - b counts as an integer
constexpr double kSeriesStop = 8.881784197001252e-16;
constexpr double kMaxTerms = 10000.0;
// Recurrences run at most this many steps; beyond, the parameters are out of reach.
constexpr double kMaxSteps = 10000.0;

bool NonPositiveInteger(double v) { return v <= 0.0 && std::fabs(v - std::round(v)) < kIntegerTol; }

double RecipGamma(double v) { return NonPositiveInteger(v) ? 0.0 : 1.0 / GammaFunc(v); }

// The power series with its estimated relative error in *loss.
double GaussSeries(double a, double b, double c, double x, double* loss) {
    double u = 1.0, s = 1.0, umax = 0.0, k = 0.0;
    int i = 0;
    do {
        if (std::fabs(c + k) < kIntegerTol) {
            *loss = 1.0;
            return kInf;
        }
        const double m = k + 1.0;
        u = u * ((a + k) * (b + k) * x / ((c + k) * m));
        s += u;
        if (std::fabs(u) > umax) umax = std::fabs(u);
        k = m;
        if (++i > kMaxTerms) {
            SpecialReport(SpecialFunction::Hyp2F1, SpecialFault::Precision);
            *loss = 1.0;
            return s;
        }
    } while (s == 0.0 || std::fabs(u / s) > kSeriesStop);
    *loss = kEps * umax / std::fabs(s) + kEps * i;
    return s;
}

// Transformations of the series: Pfaff below pfaffBelow, and near x = 1 the linear
// transformation with gammas or, where c - a - b is close to an integer, the psi expansion.
double GaussTransformed(double a, double b, double c, double x, double pfaffBelow, double* loss) {
    const bool terminates = NonPositiveInteger(a) || NonPositiveInteger(b);
    double err = 0.0, y;
    const double s = 1.0 - x;
    if (x < pfaffBelow && !terminates) {
        // The lesser of a and b goes outside.
        if (b > a)
            y = std::pow(s, -a) * GaussSeries(a, c - b, c, -x / s, &err);
        else
            y = std::pow(s, -b) * GaussSeries(c - a, b, c, -x / s, &err);
        *loss = err;
        return y;
    }
    const double d = c - a - b;
    const double id = std::round(d);
    if (x > 0.9 && !terminates && std::fabs(id) <= kMaxSteps) {
        if (std::fabs(d - id) > kGapTol) {
            y = GaussSeries(a, b, c, x, &err);
            if (err < cephes::hyp2f1::ETHRESH) {
                *loss = err;
                return y;
            }
            // Linear transformation to 1 - x (Abramowitz and Stegun 15.3.6).
            double err1;
            int sg;
            double q = GaussSeries(a, b, 1.0 - d, s, &err);
            double w = LnGammaSigned(d, &sg);
            int sign = sg;
            w -= LnGammaSigned(c - a, &sg);
            sign *= sg;
            w -= LnGammaSigned(c - b, &sg);
            sign *= sg;
            q *= sign * std::exp(w);
            double r = std::pow(s, d) * GaussSeries(c - a, c - b, d + 1.0, s, &err1);
            w = LnGammaSigned(-d, &sg);
            sign = sg;
            w -= LnGammaSigned(a, &sg);
            sign *= sg;
            w -= LnGammaSigned(b, &sg);
            sign *= sg;
            r *= sign * std::exp(w);
            y = q + r;
            const double big = std::fmax(std::fabs(q), std::fabs(r));
            err += err1 + kEps * big / std::fabs(y);
            *loss = err;
            return y * GammaFunc(c);
        }
        // c - a - b an integer: the psi expansion (15.3.10 to 15.3.12).
        double e, d1, d2;
        int aid;
        if (id >= 0.0) {
            e = d;
            d1 = d;
            d2 = 0.0;
            aid = static_cast<int>(id);
        } else {
            e = -d;
            d1 = 0.0;
            d2 = d;
            aid = static_cast<int>(-id);
        }
        const double ax = std::log(s);
        y = DigammaFunc(1.0) + DigammaFunc(1.0 + e) - DigammaFunc(a + d1) - DigammaFunc(b + d1) - ax;
        y /= GammaFunc(e + 1.0);
        double p = (a + d1) * (b + d1) * s / GammaFunc(e + 2.0);
        double t = 1.0, q;
        do {
            const double r = DigammaFunc(1.0 + t) + DigammaFunc(1.0 + t + e) - DigammaFunc(a + t + d1) -
                             DigammaFunc(b + t + d1) - ax;
            q = p * r;
            y += q;
            p *= s * (a + t + d1) / (t + 1.0);
            p *= (b + t + d1) / (t + 1.0 + e);
            t += 1.0;
            if (t > kMaxTerms) {
                SpecialReport(SpecialFunction::Hyp2F1, SpecialFault::Precision);
                *loss = 1.0;
                return kNaN;
            }
        } while (y == 0.0 || std::fabs(q / y) > kSeriesStop);
        if (id == 0.0) {
            *loss = 0.0;
            return y * GammaFunc(c) / (GammaFunc(a) * GammaFunc(b));
        }
        double y1 = 1.0;
        t = 0.0;
        p = 1.0;
        for (int i = 1; i < aid; ++i) {
            const double r = 1.0 - e + t;
            p *= s * (a + t + d2) * (b + t + d2) / r;
            t += 1.0;
            p /= t;
            y1 += p;
        }
        p = GammaFunc(c);
        y1 *= GammaFunc(e) * p / (GammaFunc(a + d1) * GammaFunc(b + d1));
        y *= p / (GammaFunc(a + d2) * GammaFunc(b + d2));
        if (aid & 1) y = -y;
        q = std::pow(s, id);
        if (id > 0.0)
            y *= q;
        else
            y1 *= q;
        *loss = 0.0;
        return y + y1;
    }
    y = GaussSeries(a, b, c, x, &err);
    *loss = err;
    return y;
}

// 2F1 on finite arguments with |x| <= 1.
double GaussCore(double a, double b, double c, double x, double pfaffBelow) {
    const double s = 1.0 - x;
    double err = 0.0;
    if (std::fabs(x) < 1.0) {
        if (std::fabs(b - c) < kIntegerTol) return std::pow(s, -a);
        if (std::fabs(a - c) < kIntegerTol) return std::pow(s, -b);
    }
    const bool aPoly = NonPositiveInteger(a), bPoly = NonPositiveInteger(b);
    if (NonPositiveInteger(c)) {
        // A pole of the series, unless a polynomial ends before the vanishing denominator.
        const bool ends = (aPoly && std::fabs(a) < std::fabs(c)) || (bPoly && std::fabs(b) < std::fabs(c));
        if (!ends) {
            SpecialReport(SpecialFunction::Hyp2F1, SpecialFault::Overflow);
            return kInf;
        }
        return GaussSeries(a, b, c, x, &err);
    }
    if (aPoly || bPoly) return GaussSeries(a, b, c, x, &err);
    const double d = c - a - b;
    if (NonPositiveInteger(c - a) || NonPositiveInteger(c - b)) {
        // Euler's transformation: the series in (c - a, c - b) terminates.
        return std::pow(s, d) * GaussSeries(c - a, c - b, c, x, &err);
    }
    if (x == 1.0) return GammaFunc(c) * GammaFunc(d) / (GammaFunc(c - a) * GammaFunc(c - b));
    if (d < 0.0) {
        const double y = GaussTransformed(a, b, c, x, pfaffBelow, &err);
        if (err < cephes::hyp2f1::ETHRESH) return y;
        // Raise c until c - a - b > 0, then come back down by the recurrence on c (15.2.27).
        const double id = std::round(d);
        if (2.0 - id > kMaxSteps) {
            SpecialReport(SpecialFunction::Hyp2F1, SpecialFault::Precision);
            return y;
        }
        const int aid = static_cast<int>(2.0 - id);
        double e = c + aid;
        double d2 = GaussCore(a, b, e, x, pfaffBelow);
        double d1 = GaussCore(a, b, e + 1.0, x, pfaffBelow);
        const double q = a + b + 1.0;
        double r = y;
        for (int i = 0; i < aid; ++i) {
            const double em = e - 1.0;
            r = (e * (em - (2.0 * e - q) * x) * d2 + (e - a) * (e - b) * x * d1) / (e * em * s);
            e = em;
            d1 = d2;
            d2 = r;
        }
        return r;
    }
    const double y = GaussTransformed(a, b, c, x, pfaffBelow, &err);
    if (err > cephes::hyp2f1::ETHRESH) SpecialReport(SpecialFunction::Hyp2F1, SpecialFault::Precision);
    return y;
}

// The asymptotic series of U for large x, accepted only if the first omitted term is below eps
// relative to the sum (or the series ends). *ok tells whether it was.
double TricomiAsymptotic(double a, double b, double x, bool* ok) {
    double t = 1.0, s = 0.0;
    for (double k = 0.0; k < 1000.0; k += 1.0) {
        s += t;
        const double next = -t * (a + k) * (a + 1.0 - b + k) / ((k + 1.0) * x);
        if (next == 0.0 || std::fabs(next) <= kEps * std::fabs(s)) {
            *ok = true;
            return s / std::pow(x, a);
        }
        if (std::fabs(next) >= std::fabs(t)) break;  // the terms stopped shrinking
        t = next;
    }
    *ok = false;
    return kNaN;
}

// U(a, b, x) = 1/Gamma(a) times the integral over t > 0 of exp(-x t) t^(a-1) (1 + t)^(b-a-1), a > 0.
double TricomiIntegral(double a, double b, double x) {
    return GammaWeightedIntegral(a, [&](double t) { return -x * t + (b - a - 1.0) * std::log1p(t); });
}

// U for x > 0 where the series cannot be used: the integral for a > 0, through Kummer's
// transformation x^(1-b) U(1+a-b, 2-b, x) where that has a positive first parameter, otherwise
// the recurrence in a downward from two positive values (13.3.7).
double TricomiByIntegral(double a, double b, double x) {
    if (a > 0.0) return TricomiIntegral(a, b, x);
    if (1.0 + a - b > 0.0) return std::pow(x, 1.0 - b) * TricomiIntegral(1.0 + a - b, 2.0 - b, x);
    const double steps = std::floor(-a) + 1.0;
    if (steps > kMaxSteps) {
        SpecialReport(SpecialFunction::Tricomi, SpecialFault::Precision);
        return kNaN;
    }
    double top = a + steps;  // in (0, 1]
    double u1 = TricomiIntegral(top + 1.0, b, x), u0 = TricomiIntegral(top, b, x);
    for (double k = 0.0; k < steps; k += 1.0) {
        const double down = -(b - 2.0 * top - x) * u0 - top * (top - b + 1.0) * u1;
        u1 = u0;
        u0 = down;
        top -= 1.0;
    }
    return u0;
}

}  // namespace

double Hyp2F1(double a, double b, double c, double x, double pfaffBelow) {
    if (!IsFinite(a) || !IsFinite(b) || !IsFinite(c) || !IsFinite(x)) return kNaN;
    if (std::fabs(x) > 1.0 || (x == 1.0 && c <= a + b)) {
        SpecialReport(SpecialFunction::Hyp2F1, SpecialFault::Domain);
        return kNaN;
    }
    return GaussCore(a, b, c, x, pfaffBelow);
}

double HypU(double a, double b, double x) {
    if (!IsFinite(x) || !IsFinite(a) || !IsFinite(b) || x < 0.0) return kNaN;
    if (x == 0.0) {
        SpecialReport(SpecialFunction::Tricomi, SpecialFault::Pole);
        return kInf;
    }
    // Where a or 1 + a - b is a non-positive integer the series ends and is exact at every x.
    const bool ends = NonPositiveInteger(a) || NonPositiveInteger(1.0 + a - b);
    bool ok = false;
    if (x >= 6.0 || ends) {
        const double u = TricomiAsymptotic(a, b, x, &ok);
        if (ok) return u;
    }
    if (x < 6.0 && !NonPositiveInteger(b) && !NonPositiveInteger(2.0 - b)) {
        // Two Kummer functions with gammas (13.2.42); kept where they do not cancel badly.
        const double t1 = GammaFunc(1.0 - b) * RecipGamma(a - b + 1.0) * Hyp1F1(a, b, x);
        const double t2 =
            GammaFunc(b - 1.0) * RecipGamma(a) * std::pow(x, 1.0 - b) * Hyp1F1(a - b + 1.0, 2.0 - b, x);
        const double u = t1 + t2;
        if (IsFinite(u) && std::fabs(t1) + std::fabs(t2) <= 16.0 * std::fabs(u)) return u;
    }
    return TricomiByIntegral(a, b, x);
}

}  // namespace tw
