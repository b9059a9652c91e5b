// Complete and incomplete elliptic integrals of the first and second kind in the parameter m, and
// Jacobi's elliptic functions. After Cephes `ellpk`, `ellpe`, `ellik`, `ellie`, `ellpj`.
#include <cmath>

#include "special/special2.hpp"
#include "special/special2_tables.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

bool OutsideUnit(double m) { return !IsFinite(m) || m < 0.0 || m > 1.0; }

// The number of whole periods pi nearest to phi: each contributes 2K (2E). Rounding to the
// nearest multiple of pi/2 instead would leave an odd count with the wrong half period.
double PeriodsOf(double phi) { return std::floor(phi / kPi + 0.5); }

// Descending Landen transformation of the amplitude for 0 <= phi < pi/2; *e, when given, gathers
// the sum of c_n sin(phi_n) that the second kind needs. Returns (atan(t) + mod pi) / (2^n a).
double Landen(double phi, double m, double* e) {
    double a = 1.0, b = std::sqrt(1.0 - m), c = std::sqrt(m), t = std::tan(phi), d = 1.0, mod = 0.0;
    double sum = 0.0;
    while (std::fabs(c / a) > kEps) {
        const double r = b / a;
        phi = phi + std::atan(t * r) + mod * kPi;
        mod = std::floor((phi + kPiOver2) / kPi);
        t = t * (1.0 + r) / (1.0 - r * t * t);
        c = 0.5 * (a - b);
        const double g = std::sqrt(a * b);
        a = 0.5 * (a + b);
        b = g;
        d += d;
        if (e != nullptr) sum += c * std::sin(phi);
    }
    if (e != nullptr) *e = sum;
    return (std::atan(t) + mod * kPi) / (d * a);
}

// F(phi | m) for 0 <= phi <= pi/2 and 0 < m < 1.
double FirstKindReduced(double phi, double m) {
    if (std::fabs(phi - kPiOver2) < kEps) return EllipticK(m);
    const double t = std::tan(phi);
    if (std::fabs(t) > 10.0) {
        // Near pi/2 the Landen steps lose the amplitude: go through the complementary one.
        const double e = 1.0 / (std::sqrt(1.0 - m) * t);
        if (std::fabs(e) < 10.0) return EllipticK(m) - FirstKindReduced(std::atan(e), m);
    }
    return Landen(phi, m, nullptr);
}

double SecondKindReduced(double phi, double m) {
    if (std::fabs(phi - kPiOver2) < kEps) return EllipticE(m);
    const double t = std::tan(phi);
    if (std::fabs(t) > 10.0) {
        const double e = 1.0 / (std::sqrt(1.0 - m) * t);
        if (std::fabs(e) < 10.0) {
            const double pe = std::atan(e);
            return EllipticE(m) + m * std::sin(phi) * std::sin(pe) - SecondKindReduced(pe, m);
        }
    }
    double sum;
    const double f = Landen(phi, m, &sum);
    return EllipticE(m) / EllipticK(m) * f + sum;
}

}  // namespace

double EllipticK(double m) {
    using namespace cephes::ellpk;
    if (OutsideUnit(m)) return kNaN;
    if (m == 1.0) {
        SpecialReport(SpecialFunction::Elliptic, SpecialFault::Pole);
        return kInf;
    }
    const double w = 1.0 - m;
    // Below 7e-6 the leading logarithmic term alone is within 1.5e-6 relative.
    if (w <= 7e-06) return C1 - 0.5 * std::log(w);
    return EvalPoly(w, P, 10) - std::log(w) * EvalPoly(w, Q, 10);
}

double EllipticE(double m) {
    using namespace cephes::ellpe;
    if (OutsideUnit(m)) return kNaN;
    const double w = 1.0 - m;
    if (w == 0.0) return 1.0;
    return EvalPoly(w, P, 10) - std::log(w) * (w * EvalPoly(w, Q, 9));
}

double EllipticF(double phi, double m) {
    if (OutsideUnit(m) || IsNaN(phi)) return kNaN;
    if (!IsFinite(phi)) return phi;
    if (m == 0.0) return phi;
    if (m == 1.0) {
        if (std::fabs(phi) >= kPiOver2) {
            SpecialReport(SpecialFunction::Elliptic, SpecialFault::Pole);
            return phi > 0.0 ? kInf : -kInf;
        }
        return std::log(std::tan(0.5 * (kPiOver2 + phi)));
    }
    const double n = PeriodsOf(phi);
    const double p = phi - n * kPi;
    const double f = FirstKindReduced(std::fabs(p), m);
    return (p < 0.0 ? -f : f) + (n != 0.0 ? 2.0 * n * EllipticK(m) : 0.0);
}

double EllipticEInc(double phi, double m) {
    if (OutsideUnit(m) || IsNaN(phi)) return kNaN;
    if (!IsFinite(phi)) return phi;
    if (m == 0.0) return phi;
    const double n = PeriodsOf(phi);
    const double p = phi - n * kPi;
    const double e = m == 1.0 ? std::sin(std::fabs(p)) : SecondKindReduced(std::fabs(p), m);
    return (p < 0.0 ? -e : e) + (n != 0.0 ? 2.0 * n * EllipticE(m) : 0.0);
}

void JacobiElliptic(double u, double m, double* sn, double* cn, double* dn, double* phi) {
    double s, c, d, ph;
    if (!IsFinite(u) || OutsideUnit(m)) {
        s = c = d = ph = kNaN;
    } else if (m < 1e-9) {
        const double t = std::sin(u), b = std::cos(u);
        const double ai = 0.25 * m * (u - t * b);
        s = t - ai * b;
        c = b + ai * t;
        ph = u - ai;
        d = 1.0 - 0.5 * m * t * t;
    } else if (m > 0.999999999) {
        double ai = 0.25 * (1.0 - m);
        const double b = std::cosh(u), t = std::tanh(u), sech = 1.0 / b;
        const double twon = b * std::sinh(u);
        s = t + ai * (twon - u) / (b * b);
        ph = 2.0 * std::atan(std::exp(u)) - kPiOver2 + ai * (twon - u) / b;
        ai *= t * sech;
        c = sech - ai * (twon - u);
        d = sech + ai * (twon + u);
    } else {
        // Arithmetic-geometric mean scale, at most 8 levels, then the descending phase sweep.
        double a[9], cc[9];
        a[0] = 1.0;
        cc[0] = std::sqrt(m);
        double b = std::sqrt(1.0 - m), twon = 1.0;
        int i = 0;
        while (std::fabs(cc[i] / a[i]) > kEps) {
            if (i > 7) {
                SpecialReport(SpecialFunction::EllipticJ, SpecialFault::Overflow);
                break;
            }
            const double ai = a[i];
            ++i;
            cc[i] = 0.5 * (ai - b);
            const double t = std::sqrt(ai * b);
            a[i] = 0.5 * (ai + b);
            b = t;
            twon *= 2.0;
        }
        double p = twon * a[i] * u;
        do {
            const double t = cc[i] * std::sin(p) / a[i];
            p = 0.5 * (std::asin(t) + p);
        } while (--i);
        s = std::sin(p);
        c = std::cos(p);
        // dn^2 = cn^2 + (1 - m) sn^2, a sum of positive terms. The ratio cn / cos(phi_1 - phi)
        // would carry the rounding of the upper phase phi_1 (1e-10 seen at |u| ~ 13).
        d = std::sqrt(c * c + (1.0 - m) * s * s);
        ph = p;
    }
    *sn = s;
    *cn = c;
    *dn = d;
    if (phi != nullptr) *phi = ph;
}

}  // namespace tw
