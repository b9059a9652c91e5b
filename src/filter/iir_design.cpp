#include "filter/iir_design.hpp"

#include <algorithm>
#include <cmath>
#include <complex>
#include <numbers>

#include "matrix/eigen.hpp"
#include "numeric/poly.hpp"
#include "signal/convolve.hpp"

namespace tw {
namespace {

using cdouble = std::complex<double>;
constexpr double kPi = std::numbers::pi;

// One analog factor of the prototype, ascending in S: (num0 + num1 S + num2 S^2) / (den0 + ...).
struct Factor {
    int32_t degree;
    double num[3];
    double den[3];
};

Factor FirstOrder(double pole, double gain) { return {1, {gain, 0, 0}, {-pole, 1, 0}}; }

// Pole pair of real part re and squared magnitude m over k2 S^2 + k0.
Factor PairFactor(double re, double m, double k2, double k0) { return {2, {k0, 0, k2}, {m, -2 * re, 1}}; }

bool IsBand(int32_t type) { return type == 2 || type == 3; }

double Theta(int32_t i, int32_t n) { return (kPi + kPi / n) / 2 + i * kPi / n; }

// The prototype's factors in section order: the real pole first, then the pairs.
Status Prototype(const IirParams& sp, Factor* f) {
    const int32_t n = sp.order, pairs = n / 2;
    const bool odd = (n & 1) != 0;
    switch (sp.prototype) {
        case IirPrototype::Butterworth: {
            if (odd) *f++ = FirstOrder(-1, 1);
            for (int32_t i = 0; i < pairs; ++i) {
                const double re = std::cos(Theta(i, n)), im = std::sin(Theta(i, n));
                const double m = re * re + im * im;
                *f++ = PairFactor(re, m, 0, m);
            }
            return 0;
        }
        case IirPrototype::Chebyshev: {
            const double p = std::pow(10.0, sp.ripple / 10);
            const double e = std::sqrt(p - 1);
            const double y = std::pow((std::sqrt(p) + 1) / e, 1.0 / n);
            const double sh = (y - 1 / y) / 2, ch = (y + 1 / y) / 2;
            if (odd) *f++ = FirstOrder(-sh, sh);
            for (int32_t i = 0; i < pairs; ++i) {
                const double re = sh * std::cos(Theta(i, n)), im = ch * std::sin(Theta(i, n));
                const double m = re * re + im * im;
                *f++ = PairFactor(re, m, 0, i == 0 && !odd ? m / std::sqrt(p) : m);
            }
            return 0;
        }
        case IirPrototype::InvChebyshev: {
            const double e = 1 / std::sqrt(std::pow(10.0, sp.attenuation / 10) - 1);
            const double y = std::pow((std::sqrt(e * e + 1) + 1) / e, 1.0 / n);
            const double sh = (y - 1 / y) / 2, ch = (y + 1 / y) / 2;
            if (odd) *f++ = FirstOrder(-1 / sh, 1 / sh);
            for (int32_t i = 0; i < pairs; ++i) {
                const cdouble pole = 1.0 / cdouble(sh * std::cos(Theta(i, n)), ch * std::sin(Theta(i, n)));
                const int32_t k = (odd ? 2 : 1) + 2 * i;
                const double z = 1 / std::sin(k * kPi / (2 * n));
                const double m = std::norm(pole);
                *f++ = PairFactor(pole.real(), m, m / (z * z), m);
            }
            return 0;
        }
        case IirPrototype::Elliptic: {
            const double e = std::sqrt(std::pow(10.0, sp.ripple / 10) - 1);
            const double es = std::sqrt(std::pow(10.0, sp.attenuation / 10) - 1);
            const double k1 = e / es, k1c = std::sqrt(1 - k1 * k1);
            const double K1 = EllipticKOfComplement(k1c), K1c = EllipticKOfComplement(k1);
            const double q = std::exp(-kPi * (K1c / K1) / n);
            double t2 = 1, t3 = 1;
            for (int32_t j = 1; j <= 25; ++j) {
                const double term = std::pow(q, j * (j + 1.0));
                t2 += term;
                t3 += 2 * std::pow(q, double(j) * j);
                if (term < 1e-15) break;
            }
            double k = 4 * std::sqrt(q) * (t2 * t2) / (t3 * t3);
            if (k >= 1) k = 0.99999999999999;
            const double kc = std::sqrt(1 - k * k);
            const double Kk = EllipticKOfComplement(kc);
            const double v0 = (Kk / n) * InverseSc(1 / e, k1) / K1;
            double S0, C0, D0;
            JacobiSnCnDn(v0, k, &S0, &C0, &D0);
            if (odd) {
                const double r = -S0 * C0 / (1 - S0 * S0);
                *f++ = FirstOrder(r, -r);
            }
            const double g = 1 / std::sqrt(e * e + 1);
            for (int32_t i = odd ? 2 : 1, j = 0; i <= n - 1; i += 2, ++j) {
                double s, c, d;
                JacobiSnCnDn(i * Kk / n, kc, &s, &c, &d);
                const double w = 1 - d * d * S0 * S0;
                const double re = -c * d * S0 * C0 / w, im = s * D0 / w;
                const double z = 1 / (s * k);
                const double m = re * re + im * im;
                const double gain = j == 0 && !odd ? g : 1.0;
                *f++ = PairFactor(re, m, gain * (m / (z * z)), gain * m);
            }
            return 0;
        }
        case IirPrototype::Bessel:
            break;
    }
    // Bessel: poles from the eigenvalues of a tridiagonal matrix of the reverse Bessel
    // polynomial, scaled so that the magnitude is -3 dB at unit frequency.
    const auto un = static_cast<size_t>(n);
    Scratch<double> work;
    Scratch<cdouble> cwork;
    if (work.Allocate(un * un + 3 * (un + 1) + 2 * (2 * un + 1)) != 0 || cwork.Allocate(4 * un + 2) != 0)
        return OutOfMemoryErr;
    double* mat = work.get();
    double* c = mat + un * un;
    double* ev = c + (un + 1);
    double* od = ev + (un + 1);
    double* q2 = od + (un + 1);
    double* o2 = q2 + (2 * un + 1);
    cdouble* poles = cwork.get();
    cdouble* qc = poles + un;
    c[0] = 1;
    for (int32_t j = 0; j < n; ++j) c[0] *= n - j / 2.0;
    for (int32_t j = 1; j < n; ++j) c[j] = 2 * c[j - 1] * (n - j + 1) / ((2.0 * n - j + 1) * j);
    c[n] = 1;
    const double g = std::pow(c[0], 1.0 / n);
    for (int32_t i = 1; i < n; ++i) c[n - i] /= std::pow(g, i);
    c[0] = 1;
    std::fill(mat, mat + un * un, 0.0);
    if (n == 1) {
        mat[0] = -1;
    } else {
        mat[0] = -1;
        mat[1] = 1;
        mat[un] = -1.0 / 3;
        for (int32_t i = 1; i <= n - 2; ++i) {
            mat[i * un + (i - 1)] = -1.0 / (2 * i + 1);
            mat[i * un + (i + 1)] = 1.0 / (2 * i + 1);
        }
        mat[(un - 1) * un + (un - 2)] = -1.0 / (2 * n - 1);
    }
    if (const Status s = GeneralEigen(mat, n, 0, poles, nullptr)) return s;
    for (int32_t i = 0; i <= n; ++i) {
        ev[i] = i % 2 == 0 ? ((i / 2) % 2 == 0 ? c[i] : -c[i]) : 0.0;
        od[i] = i % 2 == 1 ? (((i - 1) / 2) % 2 == 0 ? c[i] : -c[i]) : 0.0;
    }
    PolyMultiply(ev, n + 1, ev, n + 1, q2);
    PolyMultiply(od, n + 1, od, n + 1, o2);
    for (int32_t i = 0; i <= 2 * n; ++i) qc[i] = q2[i] + o2[i];
    qc[0] -= 2;
    int32_t count = 0;
    if (const Status s = CxPolyRoots(qc, 2 * n + 1, 100, &count)) return s;
    double largest = 0;
    for (int32_t i = 0; i < count; ++i)
        if (std::fabs(qc[i].imag()) < 1e-8) largest = std::max(largest, qc[i].real());
    // The largest real root is the -3 dB frequency of the normalised polynomial: scaling the
    // poles by its reciprocal moves it to 1.
    const double w3 = 1 / largest;
    for (int32_t i = 0; i < n; ++i) poles[i] = w3 / (g * poles[i]);
    int32_t nreal = 0;
    for (int32_t i = 0; i < n; ++i)
        if (std::fabs(poles[i].imag()) < 1e-8) ev[nreal++] = poles[i].real();
    int32_t r = 0;
    if (nreal % 2 == 1) *f++ = FirstOrder(ev[r++], w3);
    for (; r + 1 < nreal; r += 2) *f++ = {2, {w3 * w3, 0, 0}, {ev[r] * ev[r + 1], -(ev[r] + ev[r + 1]), 1}};
    for (int32_t i = 0; i < n; ++i) {
        if (std::fabs(poles[i].imag()) < 1e-8) continue;
        *f++ = PairFactor(poles[i].real(), std::norm(poles[i]), 0, w3 * w3);
        ++i;
    }
    return MergeRelease(work.Release(), cwork.Release());
}

struct Poly {
    int32_t n = 1;
    double c[5] = {1, 0, 0, 0, 0};
};

Poly Times(const Poly& p, const double* q, int32_t nq) {
    Poly r;
    PolyMultiply(p.c, p.n, q, nq, r.c);
    r.n = p.n + nq - 1;
    return r;
}

// Substitutes S and multiplies through: the coefficient of S^k of a factor of degree d becomes
// t^(d-k) u^k v^(d-k) (lowpass), t^k u^(d-k) v^k (highpass), B^(d-k) P^k (uv)^(d-k) (bandpass)
// or B^k (uv)^k P^(d-k) (bandstop), with u = 1 - x, v = 1 + x, P = u^2 + A v^2. Terms are summed
// from the highest power of S down, and the result is scaled to a constant denominator term 1.
void Substitute(const Factor& f, int32_t type, double t, double A, double B, double* num, double* den) {
    const double u[2] = {1, -1}, v[2] = {1, 1}, uv[3] = {1, 0, -1}, P[3] = {1 + A, 2 * A - 2, 1 + A};
    const int32_t d = f.degree, len = IsBand(type) ? 2 * d + 1 : d + 1;
    std::fill(num, num + len, 0.0);
    std::fill(den, den + len, 0.0);
    for (int32_t k = d; k >= 0; --k) {
        Poly p;
        double scale = 1;
        for (int32_t j = 0; j < d; ++j) {
            const bool first = j < k;  // the first k of the d factors carry S
            switch (type) {
                case 0:
                    p = first ? Times(p, u, 2) : Times(p, v, 2);
                    if (!first) scale *= t;
                    break;
                case 1:
                    p = first ? Times(p, v, 2) : Times(p, u, 2);
                    if (first) scale *= t;
                    break;
                case 2:
                    p = first ? Times(p, P, 3) : Times(p, uv, 3);
                    if (!first) scale *= B;
                    break;
                default:
                    p = first ? Times(p, uv, 3) : Times(p, P, 3);
                    if (first) scale *= B;
                    break;
            }
        }
        for (int32_t i = 0; i < len; ++i) {
            num[i] += f.num[k] * scale * p.c[i];
            den[i] += f.den[k] * scale * p.c[i];
        }
    }
    const double d0 = den[0];
    for (int32_t i = 0; i < len; ++i) num[i] /= d0;
    for (int32_t i = 1; i < len; ++i) den[i] /= d0;
    den[0] = 1;
}

int32_t Sections(int32_t order) { return (order + 1) >> 1; }

// A second-order factor (1 - x/r)(1 - x/conj r).
void Quadratic(cdouble r, double* c) {
    const double m = std::norm(r);
    c[0] = -2 * r.real() / m;
    c[1] = 1 / m;
}

// The roots used for the two halves of a fourth-order polynomial: false when it is really of
// order 2 or less.
bool SplitRoots(const double* p, cdouble* r1, cdouble* r2) {
    cdouble roots[5];
    int32_t mult[5], count = 0;
    double residual = 0;
    if (MultPolyRoots(p, 5, 0, -1, roots, mult, &count, &residual) != 0 || count < 1) return false;
    int32_t total = 0;
    for (int32_t i = 0; i < count; ++i) total += mult[i];
    if (total < 4) return false;
    *r1 = roots[0];
    *r2 = count == 1 ? roots[0] : roots[1];
    if (count > 2) {
        const double tol = 1e-8 * std::abs(roots[0]);
        for (int32_t i = 1; i < count; ++i) {
            if (std::abs(roots[i] - roots[0]) > tol && std::abs(roots[i] - std::conj(roots[0])) > tol) {
                *r2 = roots[i];
                break;
            }
        }
    }
    return true;
}

}  // namespace

bool IirDesignSizes(int32_t order, int32_t type, int32_t form, int32_t* na, int32_t* nb) {
    const int64_t s = (int64_t{order} + 1) >> 1;
    int64_t a, b;
    if (!IsBand(type)) {
        const int64_t t = (s + 1) >> 1;
        a = form == 1 ? 4 * t : 2 * s;
        b = form == 1 ? 5 * t : 3 * s;
    } else {
        a = 4 * s;
        b = form == 1 ? 5 * s : 6 * s;
    }
    if (b > INT32_MAX) return false;
    *na = static_cast<int32_t>(a);
    *nb = static_cast<int32_t>(b);
    return true;
}

Status IirDesignCheck(const IirParams& sp) {
    // For lowpass and highpass fh is ignored altogether: its stand-in could never fail a check.
    const bool usesFh = sp.type != 0 && sp.type != 1;
    if (!(sp.fs > 0) || !(sp.fl > 0) || (usesFh && (!(sp.fh > 0) || !(sp.fh > sp.fl))))
        return CutoffInvalidErr;
    if (sp.prototype == IirPrototype::InvChebyshev && !(sp.attenuation > 0)) return AttenuationNotPositiveErr;
    if (sp.fl > sp.fs / 2 || (usesFh && sp.fh > sp.fs / 2)) return CutoffAboveNyquistErr;
    if (sp.prototype == IirPrototype::Chebyshev || sp.prototype == IirPrototype::Elliptic) {
        if (!(sp.ripple > 0)) return RippleNotPositiveErr;
    }
    if (sp.prototype == IirPrototype::Elliptic) {
        if (!(sp.attenuation > 0)) return AttenuationNotPositiveErr;
        if (!(sp.attenuation > sp.ripple)) return AttenuationBelowRippleErr;
    }
    if (static_cast<uint32_t>(sp.type) > 3 || static_cast<uint32_t>(sp.form) > 1) return InvalidSelectorErr;
    return 0;
}

Status IirDesign(const IirParams& sp, double* a, double* b) {
    const int32_t s = Sections(sp.order);
    const bool band = IsBand(sp.type);
    const auto us = static_cast<size_t>(s);
    Scratch<Factor> factors;
    Scratch<double> natural;
    if (factors.Allocate(us) != 0 || natural.Allocate(9 * us) != 0) return OutOfMemoryErr;
    if (const Status st = Prototype(sp, factors.get())) return st;
    double t = 0, A = 0, B = 0;
    if (band) {
        const double t1 = std::tan(kPi * sp.fl / sp.fs), t2 = std::tan(kPi * sp.fh / sp.fs);
        A = t1 * t2;
        B = t2 - t1;
    } else {
        t = std::tan(kPi * sp.fl / sp.fs);
    }
    // The natural form: second-order sections for lowpass/highpass, fourth-order for band types.
    const int32_t m = band ? 4 : 2;
    double* na = natural.get();
    double* nb = na + 4 * us;
    for (int32_t k = 0; k < s; ++k) {
        double num[5], den[5];
        Substitute(factors[static_cast<size_t>(k)], sp.type, t, A, B, num, den);
        const int32_t len = band ? 2 * factors[static_cast<size_t>(k)].degree + 1
                                 : factors[static_cast<size_t>(k)].degree + 1;
        for (int32_t j = 0; j < m; ++j) na[m * k + j] = j + 1 < len ? den[j + 1] : 0.0;
        for (int32_t j = 0; j <= m; ++j) nb[(m + 1) * k + j] = j < len ? num[j] : 0.0;
    }
    if (sp.form == (band ? 1 : 0)) {
        std::copy(na, na + m * s, a);
        std::copy(nb, nb + (m + 1) * s, b);
    } else if (!band) {
        // Pairs of second-order sections merged; an odd count leaves the first one alone.
        int32_t k = 0, out = 0;
        if (s % 2 == 1) {
            const double pa[4] = {na[0], na[1], 0, 0}, pb[5] = {nb[0], nb[1], nb[2], 0, 0};
            std::copy(pa, pa + 4, a);
            std::copy(pb, pb + 5, b);
            k = out = 1;
        }
        for (; k + 1 < s; k += 2, ++out) {
            const double d1[3] = {1, na[2 * k], na[2 * k + 1]}, d2[3] = {1, na[2 * k + 2], na[2 * k + 3]};
            double d[5];
            ConvolveDirect(d1, 3, d2, 3, d);
            std::copy(d + 1, d + 5, a + 4 * out);
            ConvolveDirect(nb + 3 * k, 3, nb + 3 * k + 3, 3, b + 5 * out);
        }
    } else {
        for (int32_t k = 0; k < s; ++k) {
            const double* sa = na + 4 * k;
            const double* sb = nb + 5 * k;
            double* oa = a + 4 * k;
            double* ob = b + 6 * k;
            const double den[5] = {1, sa[0], sa[1], sa[2], sa[3]};
            cdouble r1, r2;
            if (SplitRoots(den, &r1, &r2)) {
                Quadratic(r1, oa);
                Quadratic(r2, oa + 2);
            } else {
                oa[0] = sa[0];
                oa[1] = sa[1];
                oa[2] = oa[3] = 0;
            }
            if (SplitRoots(sb, &r1, &r2)) {
                const double m1 = std::norm(r1), m2 = std::norm(r2);
                ob[0] = sb[0] * m1;
                ob[1] = -2 * sb[0] * r1.real();
                ob[2] = sb[0];
                ob[3] = m2;
                ob[4] = -2 * r2.real();
                ob[5] = 1;
            } else {
                ob[0] = sb[0];
                ob[1] = sb[1];
                ob[2] = sb[2];
                ob[3] = 1;
                ob[4] = ob[5] = 0;
            }
        }
    }
    return MergeRelease(factors.Release(), natural.Release());
}

double EllipticKOfComplement(double c) {
    double a = c, b = 1;
    for (int32_t i = 0; i < 25 && !(std::fabs(a - b) / a < 1e-15); ++i) {
        const double next = (a + b) / 2;
        b = std::sqrt(a * b);
        a = next;
    }
    return kPi / (2 * a);
}

// Descending Landen transformation, then back through the stored stages.
void JacobiSnCnDn(double u, double c, double* sn, double* cn, double* dn) {
    if (u == 0) {
        *sn = 0;
        *cn = 1;
        *dn = 1;
        return;
    }
    double as[25], bs[25];
    double a = 1, b = c, next = 1;
    int32_t stages = 0;
    for (;;) {
        as[stages] = a;
        bs[stages] = b;
        ++stages;
        next = (a + b) / 2;
        if (std::fabs(a - b) / a < 1e-15 || stages == 25) break;
        b = std::sqrt(a * b);
        a = next;
    }
    double v = next / std::tan(next * u), d = 1, previous = 1;
    for (int32_t j = stages - 1; j >= 0; --j) {
        const double e = v * v / (j + 1 < stages ? as[j + 1] : next);
        v = previous * v;
        d = (bs[j] + e) / (e + as[j]);
        previous = d;
    }
    *sn = 1 / std::sqrt(1 + v * v);
    *cn = *sn * v;
    *dn = d;
}

// Gauss transformation; the single-precision stop is part of the design's result.
double InverseSc(double y, double k) {
    double a = 1, b = k, d = 1 / y, s = 1;
    double l = 0;
    for (int32_t i = 0; i < 25; ++i) {
        const double p = a * b;
        s = a + b;
        a = s;
        b = 2 * std::sqrt(p);
        d = d - p / d;
        if (d == 0) d = std::sqrt(p) * 1e-15;
        if (std::fabs(s - b) < 1.2e-07 * s) {
            if (d < 0) l += 1;
            break;
        }
        l = 2 * l + (d < 0 ? 1 : 0);
    }
    return (l * kPi + std::atan(s / d)) / s;
}

}  // namespace tw
