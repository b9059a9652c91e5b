// The parabolic cylinder function D_v(x) in Whittaker's form. Integer v >= 0 by the Hermite
// recurrence. Otherwise two Kummer functions with gammas where they do not cancel (for x > 0 they
// cancel by up to e^(x^2/2)), Tricomi's function for x > 0, and for x < 0 either the integral
// e^(-x^2/4) / Gamma(-v) times that of t^(-v-1) e^(-x t - t^2/2) (v < 0) or the value at |x| plus
// twice one Kummer part (the recurrence in v is unstable there).
#include <cmath>

#include "special/bessel.hpp"
#include "special/gamma.hpp"
#include "special/gamma_weighted_integral.hpp"
#include "special/special2.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

constexpr double kHalfLn2 = 0.34657359027997264;
constexpr double kSqrt2 = 1.4142135623730951;
constexpr double kSqrtPi = 1.7724538509055159;
constexpr double kHermiteLimit = 1.0e6;  // orders beyond take the general route

double RecipGammaOrZero(double v) { return (v <= 0.0 && std::floor(v) == v) ? 0.0 : 1.0 / GammaFunc(v); }

// e^(-x^2/4) He_n(x), with He_(k+1) = x He_k - k He_(k-1), rescaled to stay finite.
double Hermite(double n, double x) {
    double h0 = 1.0, h1 = x, logScale = 0.0;
    if (n == 0.0) return std::exp(-0.25 * x * x);
    for (double k = 1.0; k < n; k += 1.0) {
        const double h2 = x * h1 - k * h0;
        h0 = h1;
        h1 = h2;
        if (std::fabs(h1) > 1e280) {
            h0 *= 1e-280;
            h1 *= 1e-280;
            logScale += 280.0 * 2.302585092994046;
        }
    }
    if (logScale == 0.0) return h1 * std::exp(-0.25 * x * x);
    if (h1 == 0.0) return 0.0;
    const double sign = h1 < 0.0 ? -1.0 : 1.0;
    return sign * std::exp(std::log(std::fabs(h1)) + logScale - 0.25 * x * x);
}

// D_v(x) for v < 0 by its integral.
double NegativeOrder(double v, double x) {
    const double i = GammaWeightedIntegral(-v, [&](double t) { return -x * t - 0.5 * t * t; });
    return std::exp(-0.25 * x * x) * i;
}

}  // namespace

double ParabolicCylinderD(double v, double x) {
    if (IsNaN(x) || IsNaN(v)) return kNaN;
    if (IsPosInf(x)) return 0.0;
    const bool wholeOrder = IsFinite(v) && v >= 0.0 && std::floor(v) == v;
    if (IsNegInf(x)) {
        if (!IsFinite(v)) return kNaN;
        if (wholeOrder) {
            // D_n(-x) = (-1)^n D_n(x), which tends to 0.
            SpecialReport(SpecialFunction::ParabolicCylinder, SpecialFault::Underflow);
            return std::fmod(v, 2.0) == 1.0 ? -0.0 : 0.0;
        }
        // D_v(-x) ~ sqrt(2 pi) / Gamma(-v) e^(x^2/4) x^(-v-1): the sign of 1 / Gamma(-v).
        SpecialReport(SpecialFunction::ParabolicCylinder, SpecialFault::Overflow);
        const bool negative = v > 0.0 && std::fmod(std::floor(v), 2.0) == 0.0;
        return negative ? -kInf : kInf;
    }
    if (!IsFinite(v)) {
        SpecialReport(SpecialFunction::ParabolicCylinder, SpecialFault::Domain);
        return kNaN;
    }
    if (wholeOrder && v <= kHermiteLimit) return Hermite(v, x);
    const double z = 0.5 * x * x;
    const double scale = std::exp(v * kHalfLn2 - 0.25 * x * x);  // 2^(v/2) e^(-x^2/4)
    // The Kummer pair where it cannot cancel much: for v < 0 and x <= 0 both parts have one sign
    // and every term of both series is positive; on 0 <= x <= 2 by a test. Elsewhere for x < 0
    // and v > 0 the pair rests on 1F1 at large arguments whose terms cancel when the first
    // parameter is near a non-positive integer.
    if (x <= 2.0 && (x >= 0.0 || v < 0.0)) {
        const double even = kSqrtPi * RecipGammaOrZero(0.5 * (1.0 - v)) * Hyp1F1(-0.5 * v, 0.5, z);
        const double odd =
            kSqrt2 * kSqrtPi * x * RecipGammaOrZero(-0.5 * v) * Hyp1F1(0.5 * (1.0 - v), 1.5, z);
        const double d = even - odd;
        if (IsFinite(d) && std::fabs(even) + std::fabs(odd) <= 16.0 * std::fabs(d)) return scale * d;
    }
    if (x > 0.0) return scale * HypU(-0.5 * v, 0.5, z);
    if (v < 0.0) return NegativeOrder(v, x);
    // x < 0: D_v(x) = D_v(|x|) + 2 (even part), or 2 (odd part) - D_v(|x|). Of the two Kummer
    // functions take the one whose first parameter lies farther from a non-positive integer:
    // near one its large terms cancel down to the polynomial part.
    const double y = ParabolicCylinderD(v, -x);
    const double a = -0.5 * v, da = std::fabs(a - std::round(a));
    if (da >= 0.25) return 2.0 * scale * kSqrtPi * RecipGammaOrZero(0.5 * (1.0 - v)) * Hyp1F1(a, 0.5, z) - y;
    return y - 2.0 * scale * kSqrt2 * kSqrtPi * x * RecipGammaOrZero(a) * Hyp1F1(0.5 * (1.0 - v), 1.5, z);
}

}  // namespace tw
