#include "special/gamma.hpp"

#include <cmath>

#include "special/special_frame.hpp"

namespace tw {

namespace {

// after Cephes `gamma`: rational approximation on [2, 3) at x - 2
constexpr double kGammaP[7] = {
    1.60119522476751861407E-4, 1.19135147006586384913E-3, 1.04213797561761569935E-2,
    4.76367800457137231464E-2, 2.07448227648435975150E-1, 4.94214826801497100753E-1,
    9.99999999999999996796E-1,
};
constexpr double kGammaQ[8] = {
    -2.31581873324120129819E-5, 5.39605580493303397842E-4, -4.45641913851797240494E-3,
    1.18139785222060435552E-2,  3.58236398605498653373E-2, -2.34591795718243348568E-1,
    7.14304917030273074085E-2,  1.00000000000000000320E0,
};

// after Cephes `stirf`: Stirling correction 1 + w P(w), w = 1/x
constexpr double kStirling[5] = {
    7.87311395793093628397E-4, -2.29549961613378126380E-4, -2.68132617805781232825E-3,
    3.47222221605458667310E-3, 8.33333333333482257126E-2,
};

// after Cephes `lgam`: asymptotic correction in 1/x^2 (A), rational on [2, 3) (B / C, C monic)
constexpr double kLnGammaA[5] = {
    8.11614167470508450300E-4,  -5.95061904284301438324E-4, 7.93650340457716943945E-4,
    -2.77777777730099687205E-3, 8.33333333333331927722E-2,
};
constexpr double kLnGammaB[6] = {
    -1.37825152569120859100E3, -3.88016315134637840924E4, -3.31612992738871184744E5,
    -1.16237097492762307383E6, -1.72173700820839662146E6, -8.53555664245765465627E5,
};
constexpr double kLnGammaC[6] = {
    -3.51815701436523470549E2, -1.70642106651881159223E4, -2.20528590553854454839E5,
    -1.13933444367982507207E6, -2.53252307177582951285E6, -2.01889141433532773231E6,
};

// after Cephes `psi`: asymptotic series in 1/x^2
constexpr double kPsiA[7] = {
    8.33333333333333333333E-2,  -2.10927960927960927961E-2, 7.57575757575757575758E-3,
    -4.16666666666666666667E-3, 3.96825396825396825397E-3,  -8.33333333333333333333E-3,
    8.33333333333333333333E-2,
};

// after Cephes `fac`: 0! to 33!
constexpr double kFactorials[34] = {
    1.00000000000000000000E0,           1.00000000000000000000E0,        2.00000000000000000000E0,
    6.00000000000000000000E0,           2.40000000000000000000E1,        1.20000000000000000000E2,
    7.20000000000000000000E2,           5.04000000000000000000E3,        4.03200000000000000000E4,
    3.62880000000000000000E5,           3.62880000000000000000E6,        3.99168000000000000000E7,
    4.79001600000000000000E8,           6.22702080000000000000E9,        8.71782912000000000000E10,
    1.30767436800000000000E12,          2.09227898880000000000E13,       3.55687428096000000000E14,
    6.40237370572800000000E15,          1.21645100408832000000E17,       2.43290200817664000000E18,
    5.10909421717094400000E19,          1.12400072777760768000E21,       2.58520167388849766400E22,
    6.20448401733239439360E23,          1.55112100433309859840E25,       4.03291461126605635584E26,
    1.0888869450418352160768E28,        3.04888344611713860501504E29,    8.841761993739701954543616E30,
    2.6525285981219105863630848E32,     8.22283865417792281772556288E33, 2.6313083693369353016721801216E35,
    8.68331761881188649551819440128E36,
};

constexpr double kSqrtTwoPi = 2.5066282746310007;
constexpr double kLnSqrtTwoPi = 0.9189385332046728;
constexpr double kStirlingSplit = 143.01608;  // above it x^(x - 0.5) would overflow before the division

}  // namespace

double StirlingGamma(double x) {
    double r;
    if (Screened(x, kInf, kNaN, &r)) return r;
    if (x >= kMaxLog || x == 0.0) {
        SpecialReport(SpecialFunction::Stirling, SpecialFault::Overflow);
        return kInf;
    }
    if (x < 0.0) {
        SpecialReport(SpecialFunction::Stirling, SpecialFault::Domain);
        return kNaN;
    }
    double w = 1.0 / x;
    w = 1.0 + w * EvalPoly(w, kStirling, 4);
    if (!IsFinite(w)) return kInf;
    const double y = std::exp(x);
    double v;
    if (x <= kStirlingSplit) {
        v = std::pow(x, x - 0.5) / y;
    } else {
        v = std::pow(x, 0.5 * x - 0.25);
        v = (v / y) * v;
    }
    return kSqrtTwoPi * v * w;
}

double GammaFunc(double x) {
    double r;
    if (Screened(x, kInf, kNaN, &r)) return r;
    const double q = std::fabs(x);
    if (q > 33.0) {
        if (x >= 0.0) return StirlingGamma(x);
        double p = std::floor(q);
        if (p == q) {
            SpecialReport(SpecialFunction::Gamma, SpecialFault::Pole);
            return kNaN;
        }
        const double sign = std::fmod(p, 2.0) != 0.0 ? 1.0 : -1.0;
        double z = q - p;
        if (z > 0.5) {
            p += 1.0;
            z = q - p;
        }
        z = q * std::sin(kPi * z);
        if (z == 0.0) {
            SpecialReport(SpecialFunction::Gamma, SpecialFault::Overflow);
            return sign * z;
        }
        return sign * (kPi / (std::fabs(z) * StirlingGamma(q)));
    }
    double z = 1.0;
    while (x >= 3.0) {
        x -= 1.0;
        z *= x;
    }
    while (x < 2.0) {
        if (std::fabs(x) < 1e-9) {
            // The poles give NaN, not a signed infinity.
            if (x == 0.0) {
                SpecialReport(SpecialFunction::Gamma, SpecialFault::Pole);
                return kNaN;
            }
            return z / ((1.0 + kEuler * x) * x);
        }
        z /= x;
        x += 1.0;
    }
    if (x == 2.0) return z;
    x -= 2.0;
    return z * EvalPoly(x, kGammaP, 6) / EvalPoly(x, kGammaQ, 7);
}

double LnGammaFunc(double x) {
    double r;
    if (Screened(x, kInf, kNaN, &r)) return r;
    // Unlike the published routine there is no reflection: log |gamma| of a negative argument is
    // not offered.
    if (x < 0.0) {
        SpecialReport(SpecialFunction::LnGamma, SpecialFault::Domain);
        return kNaN;
    }
    if (x == 0.0) {
        SpecialReport(SpecialFunction::LnGamma, SpecialFault::Pole);
        return kInf;
    }
    if (x >= 33.0) {
        double q = (x - 0.5) * std::log(x) - x + kLnSqrtTwoPi;
        const double p = 1.0 / (x * x);
        if (x < 1000.0)
            q += EvalPoly(p, kLnGammaA, 4) / x;
        else
            q += ((0.0007936507936507937 * p - 0.002777777777777778) * p + 0.08333333333333333) / x;
        return q;
    }
    double z = 1.0;
    if (x > 3.0) {
        do {
            x -= 1.0;
            z *= x;
        } while (x >= 3.0);
    }
    while (x < 2.0) {
        z /= x;
        x += 1.0;
    }
    if (x == 2.0) return std::log(std::fabs(z));
    const double u = x - 2.0;
    return std::log(std::fabs(z)) + u * EvalPoly(u, kLnGammaB, 5) / EvalPolyMonic(u, kLnGammaC, 6);
}

double FactorialFunc(int32_t n) {
    if (n < 0) {
        SpecialReport(SpecialFunction::Factorial, SpecialFault::Domain);
        return kNaN;
    }
    if (n < 34) return kFactorials[n];
    if (n <= 50) {
        // Rounded once from the extended product: within an ulp of the true value.
        long double f = kFactorials[33];
        for (int32_t k = n; k >= 34; --k) f *= k;
        return static_cast<double>(f);
    }
    return GammaFunc(n + 1.0);
}

double LnFactorialFunc(int32_t n) {
    if (n < 0) {
        SpecialReport(SpecialFunction::Factorial, SpecialFault::Domain);
        return kNaN;
    }
    if (n == 1) return 0.0;
    return LnGammaFunc(n + 1.0);
}

double DigammaFunc(double x) {
    double r;
    if (Screened(x, kInf, kNaN, &r)) return r;
    double w = x;
    bool reflect = false;
    if (x <= 0.0) {
        if (x == std::floor(x)) {
            // 1 / (x - ceil(x)) of the published form: +0 in the denominator, so +Infinity.
            SpecialReport(SpecialFunction::Digamma, SpecialFault::Pole);
            return kInf;
        }
        w = 1.0 - x;
        reflect = true;
    }
    double y;
    if (w <= 10.0 && w == std::floor(w)) {
        y = 0.0;
        const auto n = static_cast<int32_t>(w);
        for (int32_t k = 1; k < n; ++k) y += 1.0 / k;
        y -= kEuler;
    } else {
        double s = 0.0, v = w;
        while (v < 10.0) {
            s += 1.0 / v;
            v += 1.0;
        }
        double t = 0.0;
        if (v < 1e9) {
            const double z = 1.0 / (v * v);
            t = z * EvalPoly(z, kPsiA, 6);
        }
        y = std::log(v) - 0.5 / v - t - s;
    }
    // The reflection takes its angle from the reflected argument, as the published form does.
    if (reflect) y -= kPi / std::tan((1.0 - w) * kPi);
    return y;
}

double BetaFunc(double a, double b) {
    if (!IsFinite(a) || !IsFinite(b)) {
        SpecialReport(SpecialFunction::Beta, SpecialFault::Domain);
        return kNaN;
    }
    const double s = a + b;
    // The logarithmic form whenever it applies, never the direct ratio of gammas.
    if (a > 0.0 && b > 0.0) return std::exp(LnGammaFunc(a) + LnGammaFunc(b) - LnGammaFunc(s));
    if (a > 0.0 && s > 0.0) return std::exp(LnGammaFunc(a) - LnGammaFunc(s)) * GammaFunc(b);
    if (b > 0.0 && s > 0.0) return std::exp(LnGammaFunc(b) - LnGammaFunc(s)) * GammaFunc(a);
    return GammaFunc(a) * GammaFunc(b) / GammaFunc(s);
}

}  // namespace tw
