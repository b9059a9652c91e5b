// Integer orders: Miller's downward recurrence (accuracy constant 100, rescale at 1e10) where the
// upward one is unstable, the upward recurrence from orders 0 and 1 elsewhere.
#include <cmath>
#include <cstdint>

#include "special/bessel.hpp"
#include "special/gamma.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

constexpr double kRescale = 1.0e10;
constexpr double kRescaleInv = 1.0e-10;

// log of (|x|/2)^n / n!, the size of the leading series term; below -746 every value the
// recurrences could give rounds to 0, and the long loop they would run for it is skipped.
double LogLeadingTerm(int64_t n, double ax) {
    return static_cast<double>(n) * std::log(0.5 * ax) - LnGammaFunc(static_cast<double>(n) + 1.0);
}
constexpr double kLogUnderflow = -746.0;

}  // namespace

double BesselJn(int32_t order, double x) {
    double r;
    if (Screened(x, 0.0, kNaN, &r)) return r;
    int64_t n = order;
    double sign = 1.0;
    if (n < 0) {
        n = -n;
        if (n & 1) sign = -sign;
    }
    if (x < 0.0 && (n & 1)) sign = -sign;
    const double ax = std::fabs(x);
    if (n == 0) return BesselJ0(ax);
    if (n == 1) return sign * BesselJ1(ax);
    if (ax == 0.0) return 0.0;
    const double tox = 2.0 / ax;
    if (static_cast<double>(n) <= ax) {
        double bjm = BesselJ0(ax), bj = BesselJ1(ax);
        for (int64_t j = 1; j < n; ++j) {
            const double bjp = static_cast<double>(j) * tox * bj - bjm;
            bjm = bj;
            bj = bjp;
        }
        return sign * bj;
    }
    if (LogLeadingTerm(n, ax) < kLogUnderflow) return sign * 0.0;
    const int64_t m = 2 * ((n + static_cast<int64_t>(std::sqrt(100.0 * static_cast<double>(n)))) / 2);
    bool alternate = false;
    double bjp = 0.0, ans = 0.0, sum = 0.0, bj = 1.0;
    for (int64_t j = m; j > 0; --j) {
        const double bjm = static_cast<double>(j) * tox * bj - bjp;
        bjp = bj;
        bj = bjm;
        if (std::fabs(bj) > kRescale) {
            bj *= kRescaleInv;
            bjp *= kRescaleInv;
            ans *= kRescaleInv;
            sum *= kRescaleInv;
        }
        if (alternate) sum += bj;
        alternate = !alternate;
        if (j == n) ans = bjp;
    }
    sum = 2.0 * sum - bj;
    return sign * (ans / sum);
}

double BesselYn(int32_t order, double x) {
    double r;
    if (Screened(x, 0.0, kNaN, &r)) return r;
    if (x <= 0.0) {
        SpecialReport(SpecialFunction::BesselY, SpecialFault::Domain);
        return kNaN;
    }
    int64_t n = order;
    double sign = 1.0;
    if (n < 0) {
        n = -n;
        if (n & 1) sign = -sign;
    }
    if (n == 0) return BesselY0(x);
    if (n == 1) return sign * BesselY1(x);
    double ym = BesselY0(x), y = BesselY1(x);
    if (!IsFinite(ym) || !IsFinite(y)) return kNaN;
    for (int64_t k = 1; k < n; ++k) {
        const double yp = (2.0 * static_cast<double>(k) / x) * y - ym;
        if (!IsFinite(yp)) {
            SpecialReport(SpecialFunction::BesselY, SpecialFault::Overflow);
            return kNaN;
        }
        ym = y;
        y = yp;
    }
    return sign * y;
}

double BesselIn(int32_t order, double x) {
    double r;
    if (Screened(x, kInf, kNaN, &r)) return r;
    int64_t n = order < 0 ? -static_cast<int64_t>(order) : order;
    if (x == 0.0) return n == 0 ? 1.0 : 0.0;
    if (n == 0) return BesselI0(x);
    if (n == 1) return BesselI1(x);
    const double sign = (x < 0.0 && (n & 1)) ? -1.0 : 1.0;
    const double ax = std::fabs(x);
    const double dn = static_cast<double>(n);
    // The leading series term alone is exact to rounding here, and the recurrence's ratios
    // would overflow to NaN.
    if (ax < 3.0e-8) return sign * (std::pow(0.5 * ax, dn) / FactorialFunc(static_cast<int32_t>(n)));
    if (LogLeadingTerm(n, ax) + ax * ax / (4.0 * (dn + 1.0)) < kLogUnderflow) return sign * 0.0;
    // The result below is I_0 times a ratio in (0, 1]: once I_0 overflows so does it, and the
    // start of the recurrence would grow without bound with x.
    const double i0 = BesselI0(ax);
    if (!IsFinite(i0)) return sign * kInf;
    int64_t m = 2 * (n + static_cast<int64_t>(std::sqrt(100.0 * dn)));
    // The start must also lie well past the turning point of the recurrence (m^2 - n^2 >= 78 |x|):
    // the stated start alone leaves I_3(600) 12 % off.
    const double need = dn * dn + 78.0 * ax;
    if (static_cast<double>(m) * static_cast<double>(m) < need) {
        m = static_cast<int64_t>(std::ceil(std::sqrt(need)));
        while (static_cast<double>(m) * static_cast<double>(m) < need) ++m;
        if (m & 1) ++m;
    }
    const double tox = 2.0 / ax;
    double bip = 0.0, ans = 0.0, bi = 1.0;
    for (int64_t j = m; j > 0; --j) {
        const double bim = bip + static_cast<double>(j) * tox * bi;
        bip = bi;
        bi = bim;
        if (std::fabs(bi) > kRescale) {
            ans *= kRescaleInv;
            bi *= kRescaleInv;
            bip *= kRescaleInv;
        }
        if (j == n) ans = bip;
    }
    return sign * (i0 * ans / bi);
}

double BesselKn(int32_t order, double x) {
    double r;
    if (Screened(x, 0.0, kNaN, &r)) return r;
    if (x == 0.0) {
        SpecialReport(SpecialFunction::BesselK, SpecialFault::Overflow);
        return kInf;
    }
    if (x < 0.0) {
        SpecialReport(SpecialFunction::BesselK, SpecialFault::Domain);
        return kNaN;
    }
    const int64_t n = order < 0 ? -static_cast<int64_t>(order) : order;
    if (n == 0) return BesselK0(x);
    if (n == 1) return BesselK1(x);
    double km = BesselK0(x), k = BesselK1(x);
    // Once both terms are 0 (underflowed starts) every later one is too: stop there.
    for (int64_t j = 1; j < n && IsFinite(k) && !(k == 0.0 && km == 0.0); ++j) {
        const double kp = km + (2.0 * static_cast<double>(j) / x) * k;
        km = k;
        k = kp;
    }
    return k;
}

}  // namespace tw
