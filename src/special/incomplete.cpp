// The regularised incomplete beta and gamma functions.
#include <cmath>

#include "special/gamma.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

constexpr int32_t kFractionPasses = 100;  // a pass that reaches it ends quietly
// The gamma series and fraction run until they settle. Below a of about 1e13 they settle long
// before this bound; beyond, where a + 1 rounds back to a, it keeps them from holding the caller's
// thread for ever.
constexpr int32_t kGammaPasses = 1 << 26;

// A fraction stops on a relative change below eps, or on one that is not a number.
bool Settled(double change) { return change < kEps || !IsFinite(change); }

// after Cephes `incbcf` (InRatio false: in x, for x below the mean) and `incbd` (InRatio true: in
// x / (1 - x), beyond it). Both expand I_x(a, b) up to the factor x^a (1 - x)^b / (a B(a, b)); the
// second one's value still carries a factor 1 / (1 - x).
template <bool InRatio>
double IncBetaFraction(double a, double b, double x) {
    double k1 = a, k2 = InRatio ? b - 1.0 : a + b, k3 = a, k4 = a + 1.0;
    double k5 = 1.0, k6 = InRatio ? a + b : b - 1.0, k7 = a + 1.0, k8 = a + 2.0;
    const double step = InRatio ? -1.0 : 1.0;  // of k2; k6 moves the other way
    const double z = InRatio ? x / (1.0 - x) : x;
    double pkm2 = 0.0, qkm2 = 1.0, pkm1 = 1.0, qkm1 = 1.0;
    double ans = 1.0, r = 1.0;
    for (int32_t n = 0; n < kFractionPasses; ++n) {
        double xk = -(z * k1 * k2) / (k3 * k4);
        double pk = pkm1 + pkm2 * xk;
        double qk = qkm1 + qkm2 * xk;
        pkm2 = pkm1;
        pkm1 = pk;
        qkm2 = qkm1;
        qkm1 = qk;
        xk = (z * k5 * k6) / (k7 * k8);
        pk = pkm1 + pkm2 * xk;
        qk = qkm1 + qkm2 * xk;
        pkm2 = pkm1;
        pkm1 = pk;
        qkm2 = qkm1;
        qkm1 = qk;
        if (qk != 0.0) r = pk / qk;
        double change = 1.0;
        if (r != 0.0) {
            change = std::fabs((ans - r) / r);
            ans = r;
        }
        if (Settled(change)) break;
        k1 += 1.0;
        k2 += step;
        k3 += 2.0;
        k4 += 2.0;
        k5 += 1.0;
        k6 -= step;
        k7 += 2.0;
        k8 += 2.0;
        if ((InRatio ? std::fabs(pk) : std::fabs(qk) + std::fabs(pk)) > kBig) {
            pkm2 *= kBigInv;
            pkm1 *= kBigInv;
            qkm2 *= kBigInv;
            qkm1 *= kBigInv;
        }
    }
    return ans;
}

// Below this b, 1 - (1 - x)^b cancels away and its first-order term is exact to rounding.
constexpr double kTinyB = 3.637978807091712e-13;

}  // namespace

// after Cephes `incbet`, without its power series: always one of the two continued fractions,
// with the prefactor in logarithms.
double IncBeta(double a, double b, double x) {
    if (!IsFinite(x) || !IsFinite(a) || !IsFinite(b) || a < 0.0 || b < 0.0 || x < 0.0 || x > 1.0) {
        SpecialReport(SpecialFunction::IncBeta, SpecialFault::Domain);
        return kNaN;
    }
    if (x == 0.0) return 0.0;
    if (x == 1.0) return 1.0;
    if (a == 1.0) {
        if (b == 1.0) return x;
        if (b <= kTinyB) return -b * std::log(1.0 - x);
        return 1.0 - std::pow(1.0 - x, b);
    }
    const bool lower = x <= a / (a + b);
    const double p = lower ? a : b, q = lower ? b : a;
    const double w = lower ? x : 1.0 - x, v = lower ? 1.0 - x : x;
    double fraction, t;
    if ((p + q - 2.0) * w / (p - 1.0) >= 1.0) {
        fraction = IncBetaFraction<true>(p, q, w);
        t = (q - 1.0) * std::log(v);
    } else {
        fraction = IncBetaFraction<false>(p, q, w);
        t = q * std::log(v);
    }
    if (!IsFinite(fraction)) return fraction;
    const double y = p * std::log(w) + t + LnGammaFunc(p + q) - LnGammaFunc(p) - LnGammaFunc(q);
    if (!IsFinite(y)) return y;
    const double value = std::exp(y + std::log(fraction / p));
    return lower ? value : 1.0 - value;
}

// after Cephes `igam`: power series
double IncGamma(double a, double x) {
    if (IsPosInf(x)) return 1.0;
    if (IsNaN(x) || IsNaN(a) || IsNegInf(a)) return kNaN;
    if (IsPosInf(a) && x > 0.0) return kInf;
    if (x < 0.0 || a <= 0.0) {
        SpecialReport(SpecialFunction::IncGamma, SpecialFault::Domain);
        return kNaN;
    }
    if (x == 0.0) return 0.0;
    if (x > 1.0 && x > a) return 1.0 - IncGammaC(a, x);
    const double t = a * std::log(x) - x - LnGammaFunc(a);
    if (!IsFinite(t)) {
        SpecialReport(SpecialFunction::IncGamma, SpecialFault::Overflow);
        return kInf;
    }
    double r = a, c = 1.0, s = 1.0;
    int32_t passes = 0;
    do {
        r += 1.0;
        c *= x / r;
        s += c;
    } while (c / s > kEps && ++passes < kGammaPasses);
    return std::exp(t) * s / a;
}

// after Cephes `igamc`: continued fraction
double IncGammaC(double a, double x) {
    if (IsPosInf(x)) return 0.0;
    if (IsNaN(x) || IsNaN(a) || IsNegInf(a)) return kNaN;
    if (IsPosInf(a)) return kInf;
    if (x < 0.0 || a <= 0.0) {
        SpecialReport(SpecialFunction::IncGammaC, SpecialFault::Domain);
        return kNaN;
    }
    if (x == 0.0) return 1.0;
    if (x < 1.0 || x < a) return 1.0 - IncGamma(a, x);
    double y = 1.0 - a, z = x + y + 1.0, c = 0.0;
    double pkm2 = 1.0, qkm2 = x, pkm1 = x + 1.0, qkm1 = z * x;
    double ans = pkm1 / qkm1, change;
    int32_t passes = 0;
    do {
        c += 1.0;
        y += 1.0;
        z += 2.0;
        const double yc = y * c;
        const double pk = pkm1 * z - pkm2 * yc;
        const double qk = qkm1 * z - qkm2 * yc;
        if (qk != 0.0) {
            const double r = pk / qk;
            change = std::fabs((ans - r) / r);
            ans = r;
        } else {
            change = 1.0;
        }
        pkm2 = pkm1;
        pkm1 = pk;
        qkm2 = qkm1;
        qkm1 = qk;
        if (std::fabs(pk) > kBig) {
            pkm2 *= kBigInv;
            pkm1 *= kBigInv;
            qkm2 *= kBigInv;
            qkm1 *= kBigInv;
        }
    } while (change > kEps && ++passes < kGammaPasses);
    return ans * std::exp(a * std::log(x) - x - LnGammaFunc(a));
}

}  // namespace tw
