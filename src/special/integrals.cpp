// Riemann zeta, the dilogarithm, Dawson's and Fresnel's integrals, the exponential integrals E_n and
// the sine, cosine and hyperbolic sine and cosine integrals. After Cephes `zetac`, `spence`,
// `dawsn`, `fresnl`, `expn`, `sici`, `shichi`, with their tables.
#include <cmath>

#include "special/gamma.hpp"
#include "special/special2.hpp"
#include "special/special2_tables.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

constexpr double kPiSquaredOver6 = 1.6449340668482264;

// zeta(x) - 1 for x >= 0, x != 1.
double ZetaMinusOne(double x) {
    using namespace cephes::zetac;
    if (x >= 127.0) return 0.0;  // below 2^-127 the first term is lost against 1
    const double w = std::floor(x);
    if (w == x && x < 31.0) return azetac[static_cast<int>(x)];
    if (x < 1.0) return EvalPoly(x, R, 5) / ((1.0 - x) * EvalPolyMonic(x, S, 5));
    if (x <= 10.0) {
        const double b = std::pow(2.0, x) * (x - 1.0);
        const double r = 1.0 / x;
        return (x * EvalPoly(r, P, 8)) / (b * EvalPolyMonic(r, Q, 8));
    }
    if (x <= 50.0) return std::exp(EvalPoly(x, A, 10) / EvalPolyMonic(x, B, 10)) + std::pow(2.0, -x);
    // The odd terms summed, the even ones through the factor 1 / (1 - 2^-x).
    double s = 0.0, a = 1.0, b;
    do {
        a += 2.0;
        b = std::pow(a, -x);
        s += b;
    } while (b / s > kEps);
    b = std::pow(2.0, -x);
    return (s + b) / (1.0 - b);
}

}  // namespace

double Zeta(double x) {
    double r;
    if (Screened(x, x, kNaN, &r)) return r;
    if (x < -30.8148) {
        SpecialReport(SpecialFunction::Zeta, SpecialFault::Domain);
        return kNaN;
    }
    if (x < 0.0) {
        const double s = 1.0 - x;
        return std::pow(2.0 * kPi, x) * std::sin(kPiOver2 * x) * GammaFunc(s) * Zeta(s) / kPi;
    }
    if (x == 1.0) {
        SpecialReport(SpecialFunction::Zeta, SpecialFault::Pole);
        return kInf;
    }
    return ZetaMinusOne(x) + 1.0;
}

double Spence(double x) {
    using namespace cephes::spence;
    double r;
    if (Screened(x, -kInf, kNaN, &r)) return r;
    if (x < 0.0) {
        SpecialReport(SpecialFunction::Spence, SpecialFault::Domain);
        return kNaN;
    }
    if (x == 1.0) return 0.0;
    if (x == 0.0) return kPiSquaredOver6;
    int flag = 0;
    if (x > 2.0) {
        x = 1.0 / x;
        flag |= 2;
    }
    double w;
    if (x > 1.5) {
        w = 1.0 / x - 1.0;
        flag |= 2;
    } else if (x < 0.5) {
        w = -x;
        flag |= 1;
    } else {
        w = x - 1.0;
    }
    double y = -w * EvalPoly(w, A, 7) / EvalPoly(w, B, 7);
    if (flag & 1) y = kPiSquaredOver6 - std::log(x) * std::log(1.0 - x) - y;
    if (flag & 2) {
        const double z = std::log(x);
        y = -0.5 * z * z - y;
    }
    return y;
}

double Dawson(double x) {
    using namespace cephes::dawsn;
    double r;
    if (Screened(x, 0.0, -0.0, &r)) return r;
    if (x == 0.0) return x;
    const double sign = x < 0.0 ? -1.0 : 1.0;
    const double a = std::fabs(x);
    if (a < 3.25) {
        const double z = a * a;
        return sign * (a * EvalPoly(z, AN, 9) / EvalPoly(z, AD, 10));
    }
    const double w = 1.0 / (a * a);
    if (a < 6.25) return sign * 0.5 * (1.0 / a + w * EvalPoly(w, BN, 10) / (EvalPolyMonic(w, BD, 10) * a));
    if (a > 1.0e9) return sign * 0.5 / a;
    return sign * 0.5 * (1.0 / a + w * EvalPoly(w, CN, 4) / (EvalPolyMonic(w, CD, 5) * a));
}

void Fresnel(double x, double* s, double* c) {
    using namespace cephes::fresnl;
    if (IsNaN(x)) {
        *s = *c = kNaN;
        return;
    }
    double ss, cc;
    const double a = std::fabs(x);
    const double a2 = a * a;
    // The rational forms serve up to a^2 = 2.5625 (a = 1.6), the auxiliary functions beyond.
    if (a2 < 2.5625) {
        const double t = a2 * a2;
        ss = a * a2 * EvalPoly(t, sn, 5) / EvalPolyMonic(t, sd, 6);
        cc = a * EvalPoly(t, cn, 5) / EvalPoly(t, cd, 6);
    } else if (a > 36974.0) {
        ss = cc = 0.5;
    } else {
        double t = kPi * a2;
        const double u = 1.0 / (t * t);
        t = 1.0 / t;
        const double f = 1.0 - u * EvalPoly(u, fn, 9) / EvalPolyMonic(u, fd, 10);
        const double g = t * EvalPoly(u, gn, 10) / EvalPolyMonic(u, gd, 11);
        t = kPiOver2 * a2;
        const double cs = std::cos(t), sn_ = std::sin(t);
        t = kPi * a;
        cc = 0.5 + (f * sn_ - g * cs) / t;
        ss = 0.5 - (f * cs + g * sn_) / t;
    }
    if (x < 0.0) {
        cc = -cc;
        ss = -ss;
    }
    *s = ss;
    *c = cc;
}

double ExpN(int n, double x) {
    if (n < 0 || IsNaN(x) || !IsFinite(x) || x < 0.0) {
        SpecialReport(SpecialFunction::ExpN, SpecialFault::Domain);
        return kNaN;
    }
    if (x > kMaxLog) return 0.0;
    const double nd = static_cast<double>(n);
    if (x == 0.0) {
        if (n < 2) {
            SpecialReport(SpecialFunction::ExpN, SpecialFault::Pole);
            return kInf;
        }
        return 1.0 / (nd - 1.0);
    }
    if (n == 0) return std::exp(-x) / x;
    if (n > 5000) {
        // Expansion in 1 / (n + x)^2 for large order.
        const double xk = x + nd, yk = 1.0 / (xk * xk);
        double ans = yk * nd * (6.0 * x * x - 8.0 * nd * x + nd * nd);
        ans = yk * (ans + nd * (nd - 2.0 * x));
        ans = yk * (ans + nd);
        return (ans + 1.0) * std::exp(-x) / xk;
    }
    if (x > 1.0) {
        // Continued fraction, rescaled by 2^-57 when a convergent passes 2^57.
        double pkm2 = 1.0, qkm2 = x, pkm1 = 1.0, qkm1 = x + nd, ans = pkm1 / qkm1, t;
        int k = 1;
        do {
            ++k;
            double yk, xk;
            if (k & 1) {
                yk = 1.0;
                xk = nd + static_cast<double>((k - 1) / 2);
            } else {
                yk = x;
                xk = static_cast<double>(k / 2);
            }
            const double pk = pkm1 * yk + pkm2 * xk, qk = qkm1 * yk + qkm2 * xk;
            if (qk != 0.0) {
                const double r = pk / qk;
                t = std::fabs((ans - r) / r);
                ans = r;
            } else {
                t = 1.0;
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
        } while (t > kEps);
        return ans * std::exp(-x);
    }
    // Power series with psi(n) - ln x.
    double psi = -kEuler - std::log(x);
    for (int i = 1; i < n; ++i) psi += 1.0 / static_cast<double>(i);
    const double z = -x;
    double xk = 0.0, yk = 1.0, pk = 1.0 - nd, ans = n == 1 ? 0.0 : 1.0 / pk, t;
    do {
        xk += 1.0;
        yk *= z / xk;
        pk += 1.0;
        if (pk != 0.0) ans += yk / pk;
        t = ans != 0.0 ? std::fabs(yk / ans) : 1.0;
    } while (t > kEps);
    const double r = nd - 1.0;
    // (-x)^(n-1) psi / (n-1)!: past 170 the factorial overflows, so by logarithms.
    if (n <= 170) return std::pow(z, r) * psi / GammaFunc(nd) - ans;
    const double mag = std::exp(r * std::log(x) - LnGammaFunc(nd));
    return ((n - 1) % 2 == 0 ? mag : -mag) * psi - ans;
}

void SinCosIntegral(double x, double* si, double* ci) {
    using namespace cephes::sici;
    if (IsNaN(x)) {
        *si = *ci = kNaN;
        return;
    }
    if (!IsFinite(x)) {
        *si = x > 0.0 ? kPiOver2 : -kPiOver2;
        *ci = 0.0;
        return;
    }
    if (x == 0.0) {
        *si = x;
        *ci = -kInf;
        return;
    }
    const bool negative = x < 0.0;
    const double a = std::fabs(x);
    double s, c;
    if (a > 1.0e9) {
        s = kPiOver2 - std::cos(a) / a;
        c = std::sin(a) / a;
    } else if (a <= 4.0) {
        const double z = a * a;
        s = a * EvalPoly(z, SN, 5) / EvalPoly(z, SD, 5);
        c = kEuler + std::log(a) + z * EvalPoly(z, CN, 5) / EvalPoly(z, CD, 5);
    } else {
        const double sa = std::sin(a), ca = std::cos(a), z = 1.0 / (a * a);
        double f, g;
        if (a < 8.0) {
            f = EvalPoly(z, FN4, 6) / (a * EvalPolyMonic(z, FD4, 7));
            g = z * EvalPoly(z, GN4, 7) / EvalPolyMonic(z, GD4, 7);
        } else {
            f = EvalPoly(z, FN8, 8) / (a * EvalPolyMonic(z, FD8, 8));
            g = z * EvalPoly(z, GN8, 8) / EvalPolyMonic(z, GD8, 9);
        }
        s = kPiOver2 - f * ca - g * sa;
        c = f * sa - g * ca;
    }
    *si = negative ? -s : s;
    *ci = c;
}

void ShiChi(double x, double* shi, double* chi) {
    using namespace cephes::shichi;
    if (IsNaN(x)) {
        *shi = *chi = kNaN;
        return;
    }
    if (x == 0.0) {
        *shi = x;
        *chi = -kInf;
        return;
    }
    const bool negative = x < 0.0;
    const double a = std::fabs(x);
    double s, c;
    if (a > 880.0) {
        SpecialReport(SpecialFunction::ShiChi, SpecialFault::Overflow);
        s = c = kInf;
    } else if (a < 8.0) {
        const double z = a * a;
        double t = 1.0, k = 2.0;
        s = 1.0;
        c = 0.0;
        do {
            t *= z / k;
            c += t / k;
            k += 1.0;
            t /= k;
            s += t / k;
            k += 1.0;
        } while (std::fabs(t / s) > kEps);
        s *= a;
        c += kEuler + std::log(a);
    } else {
        // The second pair of Chebyshev forms serves from 18 on, up to 880; once exp(a) overflows
        // both results are infinite.
        const double e = std::exp(a);
        if (!IsFinite(e)) {
            SpecialReport(SpecialFunction::ShiChi, SpecialFault::Overflow);
            s = c = kInf;
        } else {
            const double k = e / a;
            if (a < 18.0) {
                const double t = (576.0 / a - 52.0) / 10.0;
                s = k * EvalChebyshev(t, S1, 22);
                c = k * EvalChebyshev(t, C1, 23);
            } else {
                const double t = (6336.0 / a - 212.0) / 70.0;
                s = k * EvalChebyshev(t, S2, 23);
                c = k * EvalChebyshev(t, C2, 24);
            }
            c += kEuler + std::log(a);
        }
    }
    *shi = negative ? -s : s;
    *chi = c;
}

}  // namespace tw
