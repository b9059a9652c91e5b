// I of real order through Kummer's function: I_v(x) = (x/2)^v e^-x / Gamma(v + 1) M(v + 1/2, 2v + 1, 2x),
// the series route of Cephes `iv`. Integer orders go to the recurrence of BesselIn.
#include <cmath>
#include <cstdint>

#include "special/bessel.hpp"
#include "special/gamma.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

double KummerForm(double v, double x) {
    const double m = Hyp1F1(v + 0.5, 2.0 * v + 1.0, 2.0 * x);
    const double t = v * std::log(0.5 * std::fabs(x)) - x;
    const double g = GammaFunc(v + 1.0);
    double value;
    if (IsFinite(g) && g != 0.0) {
        value = std::exp(t) / g * m;
    } else {
        // Gamma(v + 1) overflows (v above 170.6) or underflows (v below -171): its logarithm
        // keeps the factor from becoming 0 or Infinity where the value itself is representable.
        int sign;
        const double lg = LnGammaSigned(v + 1.0, &sign);
        value = sign * std::exp(t - lg) * m;
    }
    // Where M(2x) overflows the value is +Infinity, never the NaN of 0 * Infinity.
    if (IsNaN(value) && IsPosInf(m)) return kInf;
    return value;
}

}  // namespace

double BesselI(double v, double x) {
    if (IsNaN(x) || IsNaN(v) || IsNegInf(v) || IsNegInf(x)) return kNaN;
    if (IsPosInf(v)) {
        if (x == 0.0) return 0.0;
        if (IsPosInf(x)) return kNaN;
        return 0.0;  // the limit for every finite x; the formula would give 0 only below |x| = 2
    }
    if (IsPosInf(x)) return kInf;
    if (std::floor(v) == v && std::fabs(v) <= 2147483647.0) return BesselIn(static_cast<int32_t>(v), x);
    if (v < -200.0) return kNaN;
    if (x < 0.0) {
        SpecialReport(SpecialFunction::BesselI, SpecialFault::Domain);
        return kNaN;
    }
    if (x == 0.0) {
        if (v > 0.0) return 0.0;
        SpecialReport(SpecialFunction::BesselI, SpecialFault::Overflow);
        return std::fmod(std::floor(v), 2.0) != 0.0 ? kInf : -kInf;
    }
    const double h = v + 0.5;
    if (h <= 0.0 && std::floor(h) == h) {
        // b = 2v + 1 <= 0 breaks the Kummer form; recur down from orders 1/2 and 3/2 instead
        // (I_-1/2(1) would come out 0.2935 for 1.2312). The K part grows downward and carries
        // the rounding of the start values, eps I_1/2(x), along with it.
        double up = KummerForm(1.5, x), mid = KummerForm(0.5, x);
        for (double nu = 0.5; nu > v; nu -= 1.0) {
            const double down = up + (2.0 * nu / x) * mid;
            up = mid;
            mid = down;
        }
        return mid;
    }
    return KummerForm(v, x);
}

}  // namespace tw
