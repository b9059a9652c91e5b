// Airy functions Ai, Bi and their derivatives: asymptotic rational forms beyond |x| = 2.09 (and for
// Bi beyond 8.3203353, where zeta exceeds 16), the Maclaurin series elsewhere. After Cephes `airy`.
#include <cmath>

#include "special/bessel.hpp"
#include "special/bessel_tables.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

namespace t = cephes::airy;

constexpr double kLargest = 1.7976931348623157e308;

struct AiryValues {
    double ai, bi, aip, bip;
};

void Put(double* p, double v) {
    if (p != nullptr) *p = v;
}

// All four values; with derivatives false, aip and bip are left unset.
AiryValues Airy(double x, bool derivatives) {
    AiryValues r{0.0, 0.0, 0.0, 0.0};
    if (IsNaN(x)) return {kNaN, kNaN, kNaN, kNaN};
    // Beyond the largest x the published IEEE tables allow, Bi overflows; the derivatives are the
    // largest double, by design, on both sides.
    if (!IsFinite(x) || x > t::MAXAIRY_IBMPC) {
        SpecialReport(SpecialFunction::Airy, SpecialFault::Overflow);
        return {0.0, x > 0.0 ? kInf : 0.0, kLargest, kLargest};
    }
    if (x < -2.09) {
        double s = std::sqrt(-x);
        const double zeta = -2.0 * x * s / 3.0;
        s = std::sqrt(s);
        double k = t::sqpii / s;
        const double z = 1.0 / zeta;
        const double zz = z * z;
        double uf = 1.0 + zz * EvalPoly(zz, t::AFN, 8) / EvalPolyMonic(zz, t::AFD, 9);
        double ug = z * EvalPoly(zz, t::AGN, 10) / EvalPolyMonic(zz, t::AGD, 10);
        const double theta = zeta + 0.25 * kPi;
        const double f = std::sin(theta);
        const double g = std::cos(theta);
        r.ai = k * (f * uf - g * ug);
        r.bi = k * (g * uf + f * ug);
        if (derivatives) {
            uf = 1.0 + zz * EvalPoly(zz, t::APFN, 8) / EvalPolyMonic(zz, t::APFD, 9);
            ug = z * EvalPoly(zz, t::APGN, 10) / EvalPolyMonic(zz, t::APGD, 10);
            k = t::sqpii * s;
            r.aip = -k * (g * uf + f * ug);
            r.bip = k * (f * uf - g * ug);
        }
        return r;
    }
    bool haveAi = false;
    if (x >= 2.09) {
        haveAi = true;
        double s = std::sqrt(x);
        const double zeta = 2.0 * x * s / 3.0;
        const double g = std::exp(zeta);
        s = std::sqrt(s);
        double k = 2.0 * s * g;
        const double z = 1.0 / zeta;
        double f = EvalPoly(z, t::AN, 7) / EvalPoly(z, t::AD, 7);
        r.ai = t::sqpii * f / k;
        if (derivatives) {
            k = -0.5 * t::sqpii * s / g;
            f = EvalPoly(z, t::APN, 7) / EvalPoly(z, t::APD, 7);
            r.aip = f * k;
        }
        if (x > 8.3203353) {
            f = z * EvalPoly(z, t::BN16, 4) / EvalPolyMonic(z, t::BD16, 5);
            k = t::sqpii * g;
            r.bi = k * (1.0 + f) / s;
            if (derivatives) {
                f = z * EvalPoly(z, t::BPPN, 4) / EvalPolyMonic(z, t::BPPD, 5);
                r.bip = k * s * (1.0 + f);
            }
            return r;
        }
    }
    // Maclaurin series of the two solutions f and g (Ai = c1 f - c2 g, Bi = sqrt 3 (c1 f + c2 g)).
    double f = 1.0, g = x, term = 1.0, uf = 1.0, ug = x, k = 1.0;
    const double z = x * x * x;
    while (term > kEps) {
        uf *= z;
        k += 1.0;
        uf /= k;
        ug *= z;
        k += 1.0;
        ug /= k;
        uf /= k;
        f += uf;
        k += 1.0;
        ug /= k;
        g += ug;
        term = std::fabs(uf / f);
    }
    uf = t::c1 * f;
    ug = t::c2 * g;
    if (!haveAi) r.ai = uf - ug;
    r.bi = t::sqrt3 * (uf + ug);
    if (!derivatives) return r;
    k = 4.0;
    uf = x * x / 2.0;
    ug = z / 3.0;
    f = uf;
    g = 1.0 + ug;
    uf /= 3.0;
    term = 1.0;
    while (term > kEps) {
        uf *= z;
        ug /= k;
        k += 1.0;
        ug *= z;
        uf /= k;
        f += uf;
        k += 1.0;
        ug /= k;
        uf /= k;
        g += ug;
        k += 1.0;
        term = std::fabs(ug / g);
    }
    uf = t::c1 * f;
    ug = t::c2 * g;
    if (!haveAi) r.aip = uf - ug;
    r.bip = t::sqrt3 * (uf + ug);
    return r;
}

}  // namespace

void AiryFunctions(double x, double* ai, double* bi, double* aip, double* bip) {
    const bool derivatives = aip != nullptr;
    const AiryValues r = Airy(x, derivatives);
    Put(ai, r.ai);
    Put(bi, r.bi);
    if (!derivatives) return;
    Put(aip, r.aip);
    Put(bip, r.bip);
}

}  // namespace tw
