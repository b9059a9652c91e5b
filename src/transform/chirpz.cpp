#include "transform/chirpz.hpp"

#include <algorithm>
#include <cmath>

#include "signal/convolve.hpp"

namespace tw {
namespace {

double Norm(cdouble z) { return z.real() * z.real() + z.imag() * z.imag(); }

bool Finite(cdouble z) { return std::isfinite(z.real()) && std::isfinite(z.imag()); }

Status CheckRatios(cdouble A, cdouble W) {
    if (!Finite(A) || !Finite(W)) return NanInfErr;
    if (Norm(A) == 0 || Norm(W) == 0) return DegenerateDataErr;
    return 0;
}

// z^t for real t: (|z|^2)^(t/2) (cos t theta, sin t theta), theta the principal argument of z,
// with |z|^2 and theta formed once for the many powers of one ratio. Zero ratios never get here.
// The transforms work in double, as the exports define them. The inverse evaluates the same powers
// with t theta formed in extended precision: for |W| = 1 the rounding of t theta (up to m^2 |theta|
// ulp) is what limits its accuracy otherwise.
template <class Real>
struct Power {
    Real norm;
    double theta;
    explicit Power(cdouble z) : norm(Norm(z)), theta(std::atan2(z.imag(), z.real())) {}
    Power(Real n, double t) : norm(n), theta(t) {}
    // The powers of 1/z, from the same |z|^2 and angle (not from a rounded 1/z).
    Power Reciprocal() const { return {1 / norm, -theta}; }
    cdouble operator()(Real t) const {
        const Real r = std::pow(norm, t / 2);
        const Real angle = t * theta;
        return {static_cast<double>(r * std::cos(angle)), static_cast<double>(r * std::sin(angle))};
    }
};

template <class Real, class T>
void Direct(const T* x, int32_t n, cdouble A, const Power<Real>& powW, int32_t m, cdouble* y, cdouble* c) {
    c[n - 1] = Power<Real>(A)(static_cast<Real>(1 - n));
    for (int32_t k = n - 2; k >= 0; --k) c[k] = A * c[k + 1];
    std::fill(y, y + m, cdouble{});
    for (int32_t j = 0; j < m; ++j)
        for (int32_t k = 0; k < n; ++k) y[j] += x[k] * c[k] * powW(static_cast<Real>(j) * k);
}

template <class Real, class T>
Status Bluestein(const T* x, int32_t n, cdouble A, const Power<Real>& powW, int32_t m, cdouble* y) {
    const Power<Real> powA(A);
    const int32_t nh = n + m;
    Scratch<cdouble> work;
    if (const Status s = work.Allocate(static_cast<size_t>(nh) + n + (2 * size_t(n) + m - 1))) return s;
    cdouble* h = work.get();  // h[t + n] = W^(-t t / 2), t from -n to m-1
    cdouble* a = h + nh;
    cdouble* z = a + n;
    for (int32_t t = -n; t < m; ++t) h[t + n] = powW(-static_cast<Real>(t) * t / 2);
    for (int32_t k = 0; k < n; ++k) a[k] = x[k] * powA(-static_cast<Real>(k)) / h[n - k];
    Status s = CxConvolveFrequency(a, n, h, nh, z);
    if (s == 0)
        for (int32_t j = 0; j < m; ++j) y[j] = z[n + j] / h[n + j];
    return MergeRelease(s, work.Release());
}

template <class Real, class T>
Status ChirpZIn(const T* x, int32_t n, cdouble A, const Power<Real>& powW, int32_t m, int32_t method,
                cdouble* y) {
    if (method == 1) return Bluestein<Real>(x, n, A, powW, m, y);
    Scratch<cdouble> c;
    if (const Status s = c.Allocate(static_cast<size_t>(n))) return s;
    Direct<Real>(x, n, A, powW, m, y, c.get());
    return c.Release();
}

// The nodes in Leja order: the largest first, then each maximising the product of its distances
// to those already taken (summed as logarithms, which neither overflow nor underflow).
// score holds m values of work; a taken node's score is NaN (an untaken one may reach -inf when
// its distance underflows).
void LejaOrder(const cdouble* nodes, int32_t m, int32_t* order, double* score) {
    std::fill(score, score + m, 0.0);
    int32_t next = 0;
    for (int32_t j = 1; j < m; ++j)
        if (Norm(nodes[j]) > Norm(nodes[next])) next = j;
    for (int32_t i = 0; i < m; ++i) {
        order[i] = next;
        score[next] = kNaN;
        int32_t best = -1;
        for (int32_t j = 0; j < m; ++j) {
            if (std::isnan(score[j])) continue;
            score[j] += std::log(Norm(nodes[j] - nodes[next]));
            if (best < 0 || score[j] > score[best]) best = j;
        }
        next = best;
    }
}

}  // namespace

template <class T>
Status ChirpZ(const T* x, int32_t n, cdouble A, cdouble W, int32_t m, int32_t method, cdouble* y) {
    if (const Status s = CheckRatios(A, W)) return s;
    return ChirpZIn<double>(x, n, A, Power<double>(W), m, method, y);
}

template Status ChirpZ<double>(const double*, int32_t, cdouble, cdouble, int32_t, int32_t, cdouble*);
template Status ChirpZ<cdouble>(const cdouble*, int32_t, cdouble, cdouble, int32_t, int32_t, cdouble*);

namespace {

// The nodes, the node polynomial and the products P'(z_j) are carried in extended precision: its
// exponent range keeps the products clear of overflow off the unit circle, and its extra digits
// keep their rounding well below that of the data.
Status Solve(const cdouble* x, cdouble A, cdouble W, int32_t m, cdouble* work, long double* poly,
             int32_t* order, double* score, cdouble* y) {
    using ld = long double;
    cdouble* nodes = work;
    cdouble* w = nodes + m;
    cdouble* t = w + m;
    ld* pr = poly;
    ld* pi = poly + m + 1;
    ld* zr = pi + m + 1;
    ld* zi = zr + m;
    const Power<double> powW(W), powA(A);
    for (int32_t j = 0; j < m; ++j) {
        // The powers of the forward transform's own angle, but with no rounding of j theta.
        const ld angle = static_cast<ld>(j) * powW.theta;
        const ld r = std::pow(static_cast<ld>(powW.norm), static_cast<ld>(j) / 2);  // |W|^2 as in double
        zr[j] = r * std::cos(angle);
        zi[j] = r * std::sin(angle);
        nodes[j] = {static_cast<double>(zr[j]), static_cast<double>(zi[j])};
        if (!Finite(nodes[j])) return NanInfErr;  // |W|^j beyond the range of f64
    }
    for (int32_t j = 0; j < m; ++j) {
        ld dr = 1, di = 0;
        for (int32_t i = 0; i < m; ++i) {
            if (i == j) continue;
            const ld er = zr[j] - zr[i], ei = zi[j] - zi[i];
            // Nodes closer than the rounding of the angle can tell apart (W^d = 1 for some d
            // below m) make the system singular: no answer rather than an enormous one.
            const ld size = std::max(std::abs(zr[j]) + std::abs(zi[j]), std::abs(zr[i]) + std::abs(zi[i]));
            const ld tol = 0x1p-49L * (1 + std::abs(static_cast<ld>(j - i) * powW.theta)) * size;
            if (er * er + ei * ei <= tol * tol) return DivideByZeroErr;
            const ld r = dr * er - di * ei;
            di = dr * ei + di * er;
            dr = r;
        }
        // w_j = x_j / (P'(z_j) z_j)
        const ld qr = dr * zr[j] - di * zi[j], qi = dr * zi[j] + di * zr[j];
        const ld q2 = qr * qr + qi * qi;
        const ld xr = x[j].real(), xi = x[j].imag();
        w[j] = {static_cast<double>((xr * qr + xi * qi) / q2), static_cast<double>((xi * qr - xr * qi) / q2)};
    }
    LejaOrder(nodes, m, order, score);
    pr[0] = 1;
    pi[0] = 0;
    for (int32_t i = 0; i < m; ++i) {
        const ld rr = zr[order[i]], ri = zi[order[i]];
        pr[i + 1] = pr[i];
        pi[i + 1] = pi[i];
        for (int32_t k = i; k > 0; --k) {
            const ld ar = pr[k], ai = pi[k];
            pr[k] = pr[k - 1] - (rr * ar - ri * ai);
            pi[k] = pi[k - 1] - (rr * ai + ri * ar);
        }
        const ld ar = pr[0], ai = pi[0];
        pr[0] = -(rr * ar - ri * ai);
        pi[0] = -(rr * ai + ri * ar);
    }
    // t[l] = T(l + 1) = sum of w_j (1/W)^(j l); the fast method where the chirps stay near 1.
    const double spread = 0.25 * std::abs(std::log(Norm(W))) * (2.0 * m) * (2.0 * m);
    const int32_t method = m > 64 && spread <= 1 ? 1 : 0;
    if (const Status s = ChirpZIn<long double>(w, m, cdouble{1}, Power<long double>(W).Reciprocal(), m, method, t))
        return s;
    for (int32_t k = 0; k < m; ++k) {
        ld cr = 0, ci = 0;
        for (int32_t i = 0; i <= k; ++i) {
            const ld tr = t[k - i].real(), ti = t[k - i].imag();
            cr += pr[i] * tr - pi[i] * ti;
            ci += pr[i] * ti + pi[i] * tr;
        }
        y[k] = -cdouble{static_cast<double>(cr), static_cast<double>(ci)} * powA(k);
    }
    return 0;
}

}  // namespace

// With nodes z_j, the node polynomial P = sum of p_i z^i and w_j = x_j / P'(z_j), the coefficients
// of the Lagrange form are c_k = -sum over i <= k of p_i T(k+1-i), where T(l) = sum of w_j z_j^-l:
// a chirp-Z with the ratio 1/W. The samples are c_k A^k.
Status InverseChirpZ(const cdouble* x, int32_t n, cdouble A, cdouble W, int32_t m, cdouble* y) {
    if (const Status s = CheckRatios(A, W)) return s;
    if (m > n) return SizeMismatchErr;
    // The node magnitudes |W|^j are monotone in j, so the run of m nodes nearest the unit circle
    // (the best conditioned) always starts at j = 0.
    const size_t count = static_cast<size_t>(m);
    Scratch<cdouble> work;
    Scratch<long double> poly;
    Scratch<int32_t> order;
    Scratch<double> score;
    Status status = work.Allocate(3 * count);
    if (status == 0) status = poly.Allocate(4 * count + 2);
    if (status == 0) status = order.Allocate(count);
    if (status == 0) status = score.Allocate(count);
    if (status == 0) status = Solve(x, A, W, m, work.get(), poly.get(), order.get(), score.get(), y);
    status = MergeRelease(status, work.Release());
    status = MergeRelease(status, poly.Release());
    status = MergeRelease(status, order.Release());
    return MergeRelease(status, score.Release());
}
}  // namespace tw
