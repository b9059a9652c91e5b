// J and Y of real order. J is Cephes `jv`: the ascending series, Hankel's expansion, the backward
// recurrence with a continued fraction for its start, and for large order the uniform expansions
// in Airy functions (`jnx`, with `jnt` near the turning point). The regions and the order limit
// (200) are this library's. Y of non-integer order by the reflection formula.
#include <cmath>
#include <cstdint>

#include "special/bessel.hpp"
#include "special/bessel_tables.hpp"
#include "special/gamma.hpp"
#include "special/special_frame.hpp"

namespace tw {

namespace {

namespace t = cephes::jv;

constexpr double kMaxGamma = 171.624376956302725;
constexpr double kLogPi = 1.14472988584940017414;
constexpr int kMaxRecurPasses = 22000;  // beyond any continued fraction the regions lead to
constexpr double kIntegerRecurLimit = 10000.0;

// Ratio J_n / J_n-1 by its continued fraction, then the backward recurrence down to *newn.
// Returns J_newn / J_n with the orders as reached: for a negative n whose fraction is small, n is
// lowered by one and the fraction redone; with cancel, a non-negative end order rises by one when
// the last iterate but one is the larger (less cancellation in it).
double Recur(double* n, double x, double* newn, bool cancel) {
    bool negative = *n < 0.0;
    double ans = 0.0;
    for (;;) {
        double pkm2 = 0.0, qkm2 = 1.0, pkm1 = x, qkm1 = *n + *n;
        const double xk = -x * x;
        double yk = qkm1;
        ans = 0.0;
        double change;
        int count = 0;
        do {
            yk += 2.0;
            const double pk = pkm1 * yk + pkm2 * xk;
            const double qk = qkm1 * yk + qkm2 * xk;
            pkm2 = pkm1;
            pkm1 = pk;
            qkm2 = qkm1;
            qkm1 = qk;
            const double r = qk != 0.0 ? pk / qk : 0.0;
            if (r != 0.0) {
                change = std::fabs((ans - r) / r);
                ans = r;
            } else {
                change = 1.0;
            }
            if (++count > kMaxRecurPasses) {
                SpecialReport(SpecialFunction::BesselJ, SpecialFault::Underflow);
                break;
            }
            if (std::fabs(pk) > kBig) {
                pkm2 *= kBigInv;
                pkm1 *= kBigInv;
                qkm2 *= kBigInv;
                qkm1 *= kBigInv;
            }
        } while (change > kEps);
        if (ans == 0.0) ans = 1.0;
        if (negative && std::fabs(ans) < 0.125) {
            negative = false;
            *n -= 1.0;
            continue;
        }
        break;
    }
    const double kf = *newn;
    double pk = 1.0, pkm1 = 1.0 / ans, pkm2 = 0.0;
    double k = *n - 1.0;
    double r = 2.0 * k;
    do {
        pkm2 = (pkm1 * r - pk * x) / x;
        pk = pkm1;
        pkm1 = pkm2;
        r -= 2.0;
        k -= 1.0;
    } while (k > kf + 0.5);
    if (cancel && kf >= 0.0 && std::fabs(pk) > std::fabs(pkm1)) {
        k += 1.0;
        pkm2 = pk;
    }
    *newn = k;
    return pkm2;
}

// Ascending power series, with the power and gamma factor through logarithms (and the sign of
// gamma) where they would overflow or the order is negative.
double Jvs(double n, double x) {
    const double z = -x * x / 4.0;
    double u = 1.0, y = 1.0, k = 1.0, term = 1.0;
    while (term > kEps) {
        u *= z / (k * (n + k));
        y += u;
        k += 1.0;
        if (y != 0.0) term = std::fabs(u / y);
    }
    int ex;
    std::frexp(0.5 * x, &ex);
    const double scaled = static_cast<double>(ex) * n;
    if (scaled > -1023.0 && scaled < 1023.0 && n > 0.0 && n < kMaxGamma - 1.0)
        return y * (std::pow(0.5 * x, n) / GammaFunc(n + 1.0));
    int sign;
    double lg = n * std::log(0.5 * x) - LnGammaSigned(n + 1.0, &sign);
    if (y < 0.0) {
        sign = -sign;
        y = -y;
    }
    lg += std::log(y);
    if (lg < -kMaxLog) return 0.0;
    if (lg > kMaxLog) {
        SpecialReport(SpecialFunction::BesselJ, SpecialFault::Overflow);
        return kInf;
    }
    return sign * std::exp(lg);
}

// Hankel's asymptotic expansion, cut where its terms stop shrinking.
double Hankel(double n, double x) {
    const double m = 4.0 * n * n;
    double j = 1.0, k = 1.0, p = 1.0, sign = 1.0, conv = 1.0;
    const double z = 8.0 * x;
    double u = (m - 1.0) / z, q = u;
    double pp = 1.0e38, qq = 1.0e38, term = 1.0;
    bool flag = false;
    while (term > kEps) {
        k += 2.0;
        j += 1.0;
        sign = -sign;
        u *= (m - k * k) / (j * z);
        p += sign * u;
        k += 2.0;
        j += 1.0;
        u *= (m - k * k) / (j * z);
        q += sign * u;
        term = std::fabs(u / p);
        if (term < conv) {
            conv = term;
            qq = q;
            pp = p;
            flag = true;
        }
        if (flag && term > conv) break;
    }
    const double phase = x - (0.5 * n + 0.25) * kPi;
    return std::sqrt(2.0 / (kPi * x)) * (pp * std::cos(phase) - qq * std::sin(phase));
}

void AiryAll(double x, double* ai, double* aip) {
    double bi, bip;
    AiryFunctions(x, ai, &bi, aip, &bip);
}

// Transition region |x - n| small against n^(1/3).
double Jnt(double n, double x) {
    const double cbn = std::cbrt(n);
    const double z = (x - n) / cbn;
    const double cbtwo = std::cbrt(2.0);
    double ai, aip;
    AiryAll(-cbtwo * z, &ai, &aip);
    const double zz = z * z;
    const double z3 = zz * z;
    const double f[5] = {
        1.0,
        -z / 5.0,
        EvalPoly(z3, t::PF2, 1) * zz,
        EvalPoly(z3, t::PF3, 2),
        EvalPoly(z3, t::PF4, 3) * z,
    };
    const double g[4] = {
        0.3 * zz,
        EvalPoly(z3, t::PG1, 1),
        EvalPoly(z3, t::PG2, 2) * z,
        EvalPoly(z3, t::PG3, 2) * zz,
    };
    double pp = 0.0, qq = 0.0, nk = 1.0;
    const double n23 = std::cbrt(n * n);
    for (int k = 0; k <= 4; ++k) {
        pp += f[k] * nk;
        if (k != 4) qq += g[k] * nk;
        nk /= n23;
    }
    return cbtwo * ai * pp / cbn + std::cbrt(4.0) * aip * qq / n;
}

// Uniform asymptotic expansion for large order (Debye polynomials u_k in the P tables).
double Jnx(double n, double x) {
    const double cbn = std::cbrt(n);
    if (std::fabs((x - n) / cbn) < 0.7) return Jnt(n, x);
    const double z = x / n;
    const double zz = 1.0 - z * z;
    if (zz == 0.0) return 0.0;
    double sz, s3, zeta;
    int nflag;
    if (zz > 0.0) {
        sz = std::sqrt(zz);
        s3 = 1.5 * (std::log((1.0 + sz) / z) - sz);  // zeta^(3/2)
        zeta = std::cbrt(s3 * s3);
        nflag = 1;
    } else {
        sz = std::sqrt(-zz);
        s3 = 1.5 * (sz - std::acos(1.0 / z));
        zeta = -std::cbrt(s3 * s3);
        nflag = -1;
    }
    const double z32i = std::fabs(1.0 / s3);
    const double sqz = std::cbrt(s3);
    const double n23 = std::cbrt(n * n);
    double ai, aip;
    AiryAll(n23 * zeta, &ai, &aip);

    double u[8];
    const double zzi = 1.0 / zz;
    u[0] = 1.0;
    u[1] = EvalPoly(zzi, t::P1, 1) / sz;
    u[2] = EvalPoly(zzi, t::P2, 2) / zz;
    u[3] = EvalPoly(zzi, t::P3, 3) / (sz * zz);
    double pp = zz * zz;
    u[4] = EvalPoly(zzi, t::P4, 4) / pp;
    u[5] = EvalPoly(zzi, t::P5, 5) / (pp * sz);
    pp *= zz;
    u[6] = EvalPoly(zzi, t::P6, 6) / pp;
    u[7] = EvalPoly(zzi, t::P7, 7) / (pp * sz);

    pp = 0.0;
    double qq = 0.0, np = 1.0;
    bool doa = true, dob = true;
    double akl = kInf, bkl = kInf;
    for (int k = 0; k <= 3; ++k) {
        const int tk = 2 * k;
        const int tkp1 = tk + 1;
        double zp = 1.0, ak = 0.0, bk = 0.0;
        for (int s = 0; s <= tk; ++s) {
            if (doa) {
                const double sign = (s & 3) > 1 ? nflag : 1;
                ak += sign * t::mu[s] * zp * u[tk - s];
            }
            if (dob) {
                const int m = tkp1 - s;
                const double sign = ((m + 1) & 3) > 1 ? nflag : 1;
                bk += sign * t::lambda[s] * zp * u[m];
            }
            zp *= z32i;
        }
        if (doa) {
            ak *= np;
            const double a = std::fabs(ak);
            if (a < akl) {
                akl = a;
                pp += ak;
            } else {
                doa = false;
            }
        }
        if (dob) {
            bk += t::lambda[tkp1] * zp * u[0];
            // Beyond the turning point zeta^(1/2) is imaginary: B_k carries a further (-1)^k.
            bk *= -np / sqz;
            if (nflag < 0 && (k & 1)) bk = -bk;
            const double b = std::fabs(bk);
            if (b < bkl) {
                bkl = b;
                qq += bk;
            } else {
                dob = false;
            }
        }
        if (np < kEps) break;
        np /= n * n;
    }
    const double f = std::sqrt(std::sqrt(4.0 * zeta / zz));
    return f * (ai * pp / cbn + aip * qq / (n23 * n));
}

}  // namespace

double LnGammaSigned(double x, int* sign) {
    *sign = 1;
    if (x >= 0.0) return LnGammaFunc(x);
    // Reflection: Gamma(x) Gamma(1 - x) = pi / sin(pi x).
    const double q = -x;
    const double w = LnGammaFunc(q);
    double p = std::floor(q);
    if (p == q) return kInf;
    *sign = (static_cast<int64_t>(std::fmod(p, 2.0)) == 0) ? -1 : 1;
    double z = q - p;
    if (z > 0.5) {
        p += 1.0;
        z = p - q;
    }
    z = q * std::sin(kPi * z);
    if (z == 0.0) return kInf;
    return kLogPi - std::log(z) - w;
}

double BesselJ(double v, double x) {
    if (!IsFinite(x) || !IsFinite(v)) return kNaN;
    double an = std::fabs(v);
    double sign = 1.0;
    bool integer = false;
    if (std::floor(an) == an) {
        const double i = an - 16384.0 * std::floor(an / 16384.0);
        const bool odd = (static_cast<int32_t>(i) & 1) != 0;  // 0 <= i < 16384
        if (v < 0.0) {
            if (odd) sign = -sign;
            v = an;
        }
        if (x < 0.0) {
            if (odd) sign = -sign;
            x = -x;
        }
        if (v == 0.0) return BesselJn(0, x);
        if (v == 1.0) return sign * BesselJn(1, x);
        integer = an <= 2147483647.0;
    } else if (v < -200.0) {
        return kNaN;
    }
    if (x < 0.0) {
        SpecialReport(SpecialFunction::BesselJ, SpecialFault::Domain);
        return kNaN;
    }
    const double y = std::fabs(x);
    if (y < kEps) return 0.0;

    double k = 3.6 * std::sqrt(y);
    if (an > 17.0 && y < 3.6 * std::sqrt(an)) return sign * Jvs(v, x);
    if (an > 17.0 && k > an) return sign * Hankel(v, x);

    if (an >= 200.0) {
        if (v < 0.0) SpecialReport(SpecialFunction::BesselJ, SpecialFault::Precision);
        if ((x / v) / v <= 0.3) return sign * Jnx(v, x);
        return sign * Hankel(v, x);
    }
    double q;
    // The continued fraction of an integer order needs about x - n passes before it converges;
    // far beyond the orders (where non-integer orders take Hankel's expansion already) so does
    // this one, rather than run out of passes.
    if (integer && y > kIntegerRecurLimit) return sign * Hankel(v, x);
    if (integer) {
        double low = 0.0;
        q = Recur(&v, x, &low, true);
        return sign * (BesselJn(static_cast<int32_t>(low), x) / q);
    }
    if (k <= 17.0) k = 2.0;
    double order;
    if (an <= k + 3.0) {
        order = v;
        q = 1.0;
    } else {
        if (v < 0.0) k = -k;
        order = (v - std::floor(v)) + std::floor(k);
        if (v > 0.0) {
            q = Recur(&v, x, &order, true);
        } else {
            double end = v;
            q = Recur(&order, x, &end, true);
        }
        if (q == 0.0) return 0.0;
    }
    const double a = std::fabs(order);
    const double boundary = a >= 26.0 ? 0.9 * a : (0.0083 * a + 0.09) * a + 12.9;
    double value = x <= boundary ? Jvs(order, x) : Hankel(order, x);
    if (v > 0.0)
        value /= q;
    else
        value *= q;
    return sign * value;
}

double BesselY(double v, double x) {
    if (!IsFinite(x) || IsNaN(v)) return kNaN;
    if (x <= 0.0) {
        SpecialReport(SpecialFunction::BesselY, SpecialFault::Domain);
        return kNaN;
    }
    if (!IsFinite(v)) return kNaN;
    if (std::fabs(v - std::floor(v)) < 1.0e-8) {
        if (v == std::floor(v)) {
            if (std::fabs(v) <= 2147483647.0) return BesselYn(static_cast<int32_t>(v), x);
            return kNaN;
        }
        SpecialReport(SpecialFunction::BesselY, SpecialFault::Precision);
    }
    if (v < -200.0) return kNaN;
    const double jp = BesselJ(v, x);
    if (!IsFinite(jp)) return kNaN;
    const double jm = BesselJ(-v, x);
    if (!IsFinite(jm)) return kNaN;
    return (std::cos(v * kPi) * jp - jm) / std::sin(v * kPi);
}

}  // namespace tw

namespace tw {

double SphericalBesselJ(int32_t n, double x) {
    double r;
    if (Screened(x, 0.0, kNaN, &r)) return r;
    if (x < 0.0) return kNaN;
    if (x == 0.0) return n == 0 ? 1.0 : 0.0;
    return BesselJ(n + 0.5, x) * std::sqrt(kPi / (2.0 * x));
}

double SphericalBesselY(int32_t n, double x) {
    double r;
    if (Screened(x, 0.0, kNaN, &r)) return r;
    if (x < 0.0) return kNaN;
    if (x == 0.0) return -kInf;
    return BesselY(n + 0.5, x) * std::sqrt(kPi / (2.0 * x));
}

}  // namespace tw
