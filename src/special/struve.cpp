// Struve's function H_v(x) after Cephes `struve`: the series 1F2 against the asymptotic 3F0 plus
// Y_v, each with an error estimate, the lesser estimate winning.
#include <cmath>

#include "special/bessel.hpp"
#include "special/gamma.hpp"
#include "special/special2.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

constexpr double kNotTaken = 1.0e38;  // the error of a form that was not evaluated
constexpr double kSqrtPi = 1.7724538509055159;
constexpr double kHalfSqrtPi = 0.886226925452758;

// 1F2(a; b, c; x) with error estimate eps * largest term / sum.
double Hyp1F2(double a, double b, double c, double x, double* err) {
    constexpr double stop = 1.8046660579423136e-14;
    // The term limit 1.79769313486232e+308 lies beyond the largest double and rounds to
    // infinity: no finite term stops the series.
    constexpr double limit = kInf;
    double an = a, bn = b, cn = c, a0 = 1.0, sum = 1.0, n = 1.0, t = 1.0, max = 0.0;
    do {
        if (an == 0.0) break;
        if (bn == 0.0 || cn == 0.0 || a0 > limit || n > 200.0) {
            *err = kNotTaken;
            return sum;
        }
        a0 *= (an * x) / (bn * cn * n);
        sum += a0;
        an += 1.0;
        bn += 1.0;
        cn += 1.0;
        n += 1.0;
        const double z = std::fabs(a0);
        if (z > max) max = z;
        t = sum != 0.0 ? std::fabs(a0 / sum) : z;
    } while (t > stop);
    *err = std::fabs(kEps * max / sum);
    return sum;
}

// The asymptotic 3F0(a, b, c; ; x), cut before its terms grow again. A series that ends is exact
// up to rounding; otherwise the last term kept counts as the error.
double Hyp3F0(double a, double b, double c, double x, double* err) {
    constexpr double limit = 1.0e9;
    double an = a, bn = b, cn = c, a0 = 1.0, sum = 1.0, n = 1.0, t = 1.0, max = 0.0;
    double conv = 1.0e38, conv1 = conv;
    bool ended = false;
    do {
        if (an == 0.0 || bn == 0.0 || cn == 0.0) {
            ended = true;
            break;
        }
        if (a0 > limit || n > 200.0) {
            *err = kNotTaken;
            return sum;
        }
        a0 *= (an * bn * cn * x) / n;
        an += 1.0;
        bn += 1.0;
        cn += 1.0;
        n += 1.0;
        const double z = std::fabs(a0);
        if (z > max) max = z;
        if (z >= conv && z < max && z > conv1) break;
        conv1 = conv;
        conv = z;
        sum += a0;
        t = sum != 0.0 ? std::fabs(a0 / sum) : z;
    } while (t > kEps);
    const double rounding = std::fabs(kEps * max / sum);
    *err = ended ? rounding : std::fmax(rounding, std::fabs(conv / sum));
    return sum;
}

}  // namespace

double Struve(double v, double x) {
    if (!IsFinite(x) || !IsFinite(v)) return kNaN;
    const double fl = std::floor(v);
    const bool integer = fl == v;
    if (x == 0.0) {
        if (v > -1.0) return 0.0;
        if (v == -1.0) return 2.0 / (kSqrtPi * GammaFunc(0.5));
        SpecialReport(SpecialFunction::Struve, SpecialFault::Domain);
        return kNaN;
    }
    if (x < 0.0 && !integer) {
        SpecialReport(SpecialFunction::Struve, SpecialFault::Domain);
        return kNaN;
    }
    if (v < 0.0 && v - fl == 0.5) {
        // H_(-n-1/2) = (-1)^n J_(n+1/2).
        const double y = BesselJ(-v, x);
        const double f = 1.0 - fl;
        return 2.0 * std::floor(0.5 * f) != f ? -y : y;
    }
    if (x < 0.0) {
        // Integer order: H_v(-x) = (-1)^(v+1) H_v(x); the asymptotic form holds for x > 0 only.
        const double y = Struve(v, -x);
        return std::fmod(std::fabs(v), 2.0) == 1.0 ? y : -y;
    }
    const double t = 0.25 * x * x;
    const double f = std::fabs(x), g = 1.5 * std::fabs(v);
    double seriesErr = kNotTaken, asymErr = kNotTaken, y = 0.0, ya = 0.0;
    if (!(f > 30.0 && f > g)) y = Hyp1F2(1.0, 1.5, 1.5 + v, -t, &seriesErr);
    if (!(f < 18.0)) ya = Hyp3F0(1.0, 0.5, 0.5 - v, -1.0 / t, &asymErr);
    const double h = std::pow(0.5 * x, v - 1.0);
    if (seriesErr <= asymErr) return y * h * t / (kHalfSqrtPi * GammaFunc(v + 1.5));
    return ya * h / (kSqrtPi * GammaFunc(v + 0.5)) + BesselY(v, x);
}

}  // namespace tw
