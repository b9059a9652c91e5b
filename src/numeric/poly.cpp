#include "numeric/poly.hpp"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>

#include "matrix/decompose.hpp"
#include "matrix/eigen.hpp"
#include "matrix/solve.hpp"

namespace tw {

namespace {

constexpr double kInf = std::numeric_limits<double>::infinity();

size_t Sz(int32_t n) { return static_cast<size_t>(n); }

// Complex products written out: the library's own error bounds assume the plain formula.
inline double Mul(double a, double b) { return a * b; }
inline cdouble Mul(cdouble a, cdouble b) {
    return {a.real() * b.real() - a.imag() * b.imag(), a.real() * b.imag() + a.imag() * b.real()};
}

// Magnitudes safe from overflow and underflow of the squares: coefficients may span the range.
inline double Abs(double x) { return std::fabs(x); }
inline double Abs(cdouble z) { return std::abs(z); }

template <class T>
double Norm(const T* x, int32_t n) {
    double big = 0;
    for (int32_t i = 0; i < n; ++i) big = std::max(big, Abs(x[i]));
    if (!(big > 0) || !std::isfinite(big)) return big;
    double s = 0;
    for (int32_t i = 0; i < n; ++i) s += Abs2(x[i] / big);
    return big * std::sqrt(s);
}

// Exact scaling by powers of two: b_k = a_k 2^(k s - shift), with s making |b_0| and |b_d| of one
// size and shift bringing the largest |b_k| near 1, so that none overflows (what underflows is
// negligible beside it). Roots scale back by 2^s without rounding.
struct PowerScale {
    int32_t s, shift;
};
PowerScale Balance(const cdouble* a, int32_t d) {
    const int e0 = std::ilogb(Abs(a[0])), ed = std::ilogb(Abs(a[d]));
    const auto s = static_cast<int32_t>(std::lround(static_cast<double>(e0 - ed) / d));
    int64_t top = INT32_MIN;
    for (int32_t k = 0; k <= d; ++k)
        if (a[k] != 0.0) top = std::max(top, std::ilogb(Abs(a[k])) + int64_t{k} * s);
    return {s, static_cast<int32_t>(std::clamp<int64_t>(top, -100000, 100000))};
}
int Exponent(int64_t e) { return static_cast<int>(std::clamp<int64_t>(e, -100000, 100000)); }
cdouble Ldexp(cdouble z, int64_t e) {
    return {std::ldexp(z.real(), Exponent(e)), std::ldexp(z.imag(), Exponent(e))};
}
cdouble ScaledCoefficient(cdouble a, int32_t k, PowerScale ps) {
    return Ldexp(a, int64_t{k} * ps.s - ps.shift);
}
bool Finite(cdouble z) { return std::isfinite(z.real()) && std::isfinite(z.imag()); }

// Index of the highest non-zero coefficient, -1 when all are 0.
template <class T>
int32_t Degree(const T* c, int32_t n) {
    while (n > 0 && c[n - 1] == T(0)) --n;
    return n - 1;
}

// p(z), p'(z) and sum |a_k| |z|^k by Horner's rule on the degree-d polynomial a; mag holds |a_k|.
struct Value {
    cdouble p, dp;
    double bound;
};
Value Horner(const cdouble* a, const double* mag, int32_t d, cdouble z) {
    const double az = Abs(z);
    cdouble p = a[d], dp = 0;
    double e = mag[d];
    for (int32_t k = d - 1; k >= 0; --k) {
        dp = Mul(dp, z) + p;
        p = Mul(p, z) + a[k];
        e = e * az + mag[k];
    }
    return {p, dp, e};
}

double HornerReal(const double* a, int32_t n, double x) {
    if (n < 1) return 0;
    double p = a[n - 1];
    for (int32_t k = n - 2; k >= 0; --k) p = p * x + a[k];
    return p;
}

// Roots of a0 + a1 x + a2 x^2 in the scaled form: the larger root by the formula, the smaller
// from the product, with Smith's division throughout.
void Quadratic(cdouble a0, cdouble a1, cdouble a2, cdouble* r) {
    const cdouble h = Divide(a1, a2) * -0.5, c = Divide(a0, a2);
    const double s = std::max(Abs(h), std::sqrt(Abs(c)));
    if (s == 0) {
        r[0] = r[1] = 0;
        return;
    }
    const cdouble hs = h / s;
    const cdouble disc = s * std::sqrt(Mul(hs, hs) - (c / s) / s);
    const cdouble big = (h.real() * disc.real() + h.imag() * disc.imag()) >= 0 ? h + disc : h - disc;
    r[0] = big;
    r[1] = big == 0.0 ? cdouble(0) : Divide(c, big);
}

// One root of the degree-d polynomial a (a[0] != 0) by Newton's method with a guarded search,
// after Madsen (BIT 1973) and Madsen-Reid: the start lies inside the smallest root magnitude,
// steps grow by at most 3, a step that does not lower |p| is halved, then turned by (-0.3, 0.4).
// Only improving iterates are taken, so the one returned has the least |p| met.
cdouble SearchRoot(const cdouble* a, int32_t d, int32_t limit, double* mag) {
    for (int32_t k = 0; k <= d; ++k) mag[k] = Abs(a[k]);
    const double l0 = std::log(mag[0]);
    double radius = kInf;
    for (int32_t k = 1; k <= d; ++k)
        if (mag[k] != 0) radius = std::min(radius, std::exp((l0 - std::log(mag[k])) / k));
    radius *= 0.5;
    cdouble dz = a[1] != 0.0 ? Divide(-a[0], a[1]) : cdouble(1.0);
    dz = dz / Abs(dz) * radius;
    if (!std::isfinite(Abs(dz)) || dz == 0.0) dz = 1.0;
    const double accept = 16.0 * d * kEps;
    cdouble z0 = 0;
    double f0 = mag[0];
    int32_t rejects = 0;
    for (int32_t it = 0; it < limit; ++it) {
        const cdouble z = z0 + dz;
        if (z == z0) break;
        const Value v = Horner(a, mag, d, z);
        const double f = Abs(v.p);
        if (f < f0) {
            z0 = z;
            f0 = f;
            rejects = 0;
            if (f <= accept * v.bound) break;
            if (v.dp != 0.0) {
                cdouble step = -Divide(v.p, v.dp);
                const double ms = Abs(step), md = Abs(dz);
                if (ms > 3 * md) step *= 3 * md / ms;
                dz = step;
            } else {
                dz *= cdouble(-0.3, 0.4);
            }
        } else {
            dz *= ++rejects == 1 ? cdouble(0.5) : cdouble(-0.3, 0.4);
        }
    }
    return z0;
}

// Synthetic division of the degree-d polynomial a by (x - z), in place; the quotient keeps a[0..d-1].
void Deflate(cdouble* a, int32_t d, cdouble z) {
    cdouble carry = a[d];
    for (int32_t k = d - 1; k >= 0; --k) {
        const cdouble t = a[k];
        a[k] = carry;
        carry = t + Mul(z, carry);
    }
}

// Relative change of a Bairstow parameter; one of a zero parameter stays as it was.
double RelativeChange(double step, double value, double previous) {
    if (value != 0) return std::fabs(step / value);
    return step != 0 ? previous : 0.0;
}

// C (rows n + k - 1 by k, row-major, leading dimension ld, from column col): the convolution
// matrix of the n coefficients p acting on k coefficients.
template <class T>
void ConvColumns(const T* p, int32_t n, int32_t k, T* c, int32_t ld, int32_t col) {
    for (int32_t j = 0; j < k; ++j)
        for (int32_t i = 0; i < n; ++i) c[Sz(i + j) * Sz(ld) + Sz(col + j)] = p[i];
}

// The greatest common divisor of p (degree m) and q (degree n), 1 <= n <= m, both with non-zero
// leading coefficient. g (monic, *dg + 1 coefficients), up = p / g and uq = q / g in the caller's
// scaling. Zeng-Dayton: the first Sylvester subresultant whose smallest singular value falls below
// sqrt(2 j + 2) tol gives the degree and the cofactors, Gauss-Newton refines all three together.
template <class T>
Status GcdCore(const T* p, int32_t m, const T* q, int32_t n, double tol, T* g, int32_t* dg, T* up, T* uq) {
    const double np = Norm(p, m + 1), nq = Norm(q, n + 1);
    const int32_t rowsMax = m + n + 3, colsMax = m + n + 3;
    Scratch<T> work;
    Scratch<double> sv;
    const size_t big = Sz(rowsMax) * Sz(colsMax);
    if (work.Allocate(2 * big + 8 * Sz(rowsMax)) != 0 || sv.Allocate(Sz(colsMax)) != 0) return OutOfMemoryErr;
    T* mat = work.get();
    T* vecs = mat + big;
    T* pn = vecs + big;
    T* qn = pn + (m + 1);
    T* z = qn + (n + 1);    // g, up, uq
    T* best = z + rowsMax;  // the best iterate of the refinement
    T* res = best + rowsMax;
    T* step = res + rowsMax;
    T* r = step + rowsMax;
    for (int32_t i = 0; i <= m; ++i) pn[i] = p[i] / np;
    for (int32_t i = 0; i <= n; ++i) qn[i] = q[i] / nq;
    // Every subresultant is a column subset of the full Sylvester matrix (the last trial), so its
    // smallest singular value is no smaller than the full one's, and its bound no larger: when
    // the full matrix passes no trial can, and the operands are coprime after one decomposition.
    int32_t first = 1;
    {
        const int32_t size = m + n;
        std::fill(mat, mat + Sz(size) * Sz(size), T(0));
        ConvColumns(pn, m + 1, n, mat, size, 0);
        ConvColumns(qn, n + 1, m, mat, size, n);
        if (const Status s = SingularValues<T>(mat, size, size, sv.get())) return s;
        if (!(sv[Sz(size - 1)] < std::sqrt(2.0 * n + 2.0) * tol)) first = n + 1;
    }
    for (int32_t j = first; j <= n; ++j) {
        const int32_t k = n - j + 1, c1 = n - k + 1, c2 = m - k + 1, rows = m + n - k + 1, cols = c1 + c2;
        const double bound = std::sqrt(2.0 * j + 2.0) * tol;
        std::fill(mat, mat + Sz(rows) * Sz(cols), T(0));
        ConvColumns(pn, m + 1, c1, mat, cols, 0);
        ConvColumns(qn, n + 1, c2, mat, cols, c1);
        if (const Status s = SingularValues<T>(mat, rows, cols, sv.get())) return s;
        if (!(sv[Sz(cols - 1)] < bound)) continue;
        if (const Status s = FullSvd<T>(mat, rows, cols, nullptr, sv.get(), vecs)) return s;
        // Null vector [uq; -up]: pn uq - qn up = 0.
        const int32_t ng = k + 1, N = ng + c2 + c1, R = 1 + (m + 1) + (n + 1);
        T* zg = z;
        T* zp = z + ng;
        T* zq = zp + c2;
        for (int32_t i = 0; i < c1; ++i) zq[i] = vecs[Sz(i) * Sz(cols) + Sz(cols - 1)];
        for (int32_t i = 0; i < c2; ++i) zp[i] = -vecs[Sz(c1 + i) * Sz(cols) + Sz(cols - 1)];
        // g from the least-squares division of both operands by their cofactors.
        std::fill(mat, mat + Sz(m + n + 2) * Sz(ng), T(0));
        ConvColumns(zp, c2, ng, mat, ng, 0);
        ConvColumns(zq, c1, ng, mat + Sz(m + 1) * Sz(ng), ng, 0);
        std::copy(pn, pn + m + 1, res);
        std::copy(qn, qn + n + 1, res + m + 1);
        if (const Status s = SolveBySvd<T>(mat, m + n + 2, ng, res, 1, zg, 0.0); s < 0) return s;
        const double gg = Norm(zg, ng);
        if (!(gg > 0) || !std::isfinite(gg)) continue;
        for (int32_t i = 0; i < ng; ++i) r[i] = zg[i] / (gg * gg);
        // Gauss-Newton on (r^H g - 1, g up - pn, g uq - qn), keeping the best iterate.
        double bestRes = kInf;
        for (int32_t it = 0; it <= 12; ++it) {
            T acc = -1.0;
            for (int32_t i = 0; i < ng; ++i) acc += Mul(Conj(r[i]), zg[i]);
            res[0] = acc;
            PolyMultiply(zg, ng, zp, c2, res + 1);
            PolyMultiply(zg, ng, zq, c1, res + 2 + m);
            for (int32_t i = 0; i <= m; ++i) res[1 + i] -= pn[i];
            for (int32_t i = 0; i <= n; ++i) res[2 + m + i] -= qn[i];
            const double now = std::max(Norm(res + 1, m + 1), Norm(res + 2 + m, n + 1));
            if (!(now < bestRes)) break;
            bestRes = now;
            std::copy(z, z + N, best);
            if (now <= 4 * kEps) break;
            std::fill(mat, mat + Sz(R) * Sz(N), T(0));
            for (int32_t i = 0; i < ng; ++i) mat[Sz(i)] = Conj(r[i]);
            ConvColumns(zp, c2, ng, mat + Sz(N), N, 0);
            ConvColumns(zg, ng, c2, mat + Sz(N), N, ng);
            ConvColumns(zq, c1, ng, mat + Sz(m + 2) * Sz(N), N, 0);
            ConvColumns(zg, ng, c1, mat + Sz(m + 2) * Sz(N), N, ng + c2);
            if (const Status s = SolveBySvd<T>(mat, R, N, res, 1, step, 0.0); s < 0) return s;
            for (int32_t i = 0; i < N; ++i) z[i] -= step[i];
        }
        if (!(bestRes <= bound)) continue;
        const T lead = best[k];
        for (int32_t i = 0; i < ng; ++i) g[i] = best[i] / lead;
        for (int32_t i = 0; i < c2; ++i) up[i] = best[ng + i] * lead * np;
        for (int32_t i = 0; i < c1; ++i) uq[i] = best[ng + c2 + i] * lead * nq;
        *dg = k;
        return 0;
    }
    g[0] = 1.0;
    std::copy(p, p + m + 1, up);
    std::copy(q, q + n + 1, uq);
    *dg = 0;
    return 0;
}

// Zeng's MultRoot (2005) on the degree-e polynomial q (q[0] != 0, e >= 3): the multiplicity structure
// from the chain of divisors f_{j+1} = gcd(f_j, f_j'), the roots of the square-free quotients,
// then Gauss-Newton on the manifold of polynomials with that structure. roots and mult get the
// s distinct roots.
Status MultRootCore(const cdouble* q, int32_t e, int32_t limit, double tol, cdouble* roots, int32_t* mult,
                    int32_t* s) {
    const size_t n1 = Sz(e + 1);
    Scratch<cdouble> work;
    Scratch<int32_t> level;
    if (work.Allocate(6 * n1 + n1 * n1 + 2 * n1) != 0 || level.Allocate(n1) != 0) return OutOfMemoryErr;
    cdouble* f = work.get();
    cdouble* fd = f + n1;
    cdouble* g = fd + n1;
    cdouble* u = g + n1;
    cdouble* v = u + n1;
    cdouble* w = v + n1;
    cdouble* jac = w + n1;
    cdouble* target = jac + n1 * n1;
    cdouble* step = target + n1;
    std::copy(q, q + e + 1, f);
    const double gcdTol = 100 * tol;
    int32_t deg = e, distinct = 0, total = 0;
    for (int32_t j = 1; deg >= 1; ++j) {
        for (int32_t i = 1; i <= deg; ++i) fd[i - 1] = f[i] * static_cast<double>(i);
        int32_t ng = 0, nu = 0, nv = 0;
        double res = 0;
        if (deg == 1) {
            g[0] = 1.0;
            ng = 1;
            std::copy(f, f + 2, u);
            nu = 2;
        } else if (const Status st =
                       PolyGcd<cdouble>(f, deg + 1, fd, deg, gcdTol, g, &ng, u, &nu, v, &nv, &res);
                   st < 0) {
            return st;
        }
        // The roots of u are the roots of multiplicity j or more.
        int32_t cnt = 0;
        if (const Status st = CxPolyRoots(u, nu, limit, &cnt); st < 0) return st;
        if (j == 1) {
            for (int32_t i = 0; i < cnt; ++i) {
                roots[i] = u[i];
                mult[i] = 1;
                level[Sz(i)] = 1;
            }
            distinct = cnt;
        } else {
            for (int32_t i = 0; i < cnt; ++i) {
                int32_t pick = -1;
                double dist = kInf;
                for (int32_t r = 0; r < distinct; ++r) {
                    const double dd = Abs2(roots[r] - u[i]);
                    if (mult[r] == j - 1 && level[Sz(r)] != j && dd < dist) {
                        dist = dd;
                        pick = r;
                    }
                }
                if (pick < 0) return NoConvergenceErr;
                ++mult[pick];
                level[Sz(pick)] = j;
            }
        }
        total += cnt;
        deg = ng - 1;
        std::copy(g, g + ng, f);
    }
    if (total != e) return NoConvergenceErr;
    // Gauss-Newton: weighted coefficients of prod (x - z_i)^{m_i} against the monic target.
    for (int32_t k = 0; k < e; ++k) target[k] = q[k] / q[e];
    target[e] = 1.0;
    const auto product = [&](const cdouble* z) {
        g[0] = 1.0;
        int32_t len = 1;
        for (int32_t r = 0; r < distinct; ++r)
            for (int32_t t = 0; t < mult[r]; ++t) {
                g[len] = 0;
                for (int32_t k = len; k >= 1; --k) g[k] = g[k - 1] - Mul(z[r], g[k]);
                g[0] = -Mul(z[r], g[0]);
                ++len;
            }
    };
    double bestRes = kInf;
    for (int32_t it = 0; it < 20; ++it) {
        product(roots);
        for (int32_t k = 0; k < e; ++k) w[k] = (g[k] - target[k]) / std::max(1.0, Abs(target[k]));
        const double now = Norm(w, e);
        if (!std::isfinite(now)) return NoConvergenceErr;
        if (!(now < bestRes)) break;
        bestRes = now;
        std::copy(roots, roots + distinct, v);
        // Column r: -m_r times the coefficients of g / (x - z_r).
        for (int32_t r = 0; r < distinct; ++r) {
            cdouble carry = g[e];
            for (int32_t k = e - 1; k >= 0; --k) {
                jac[Sz(k) * Sz(distinct) + Sz(r)] =
                    -static_cast<double>(mult[r]) * carry / std::max(1.0, Abs(target[k]));
                carry = g[k] + Mul(roots[r], carry);
            }
        }
        if (const Status st = SolveBySvd<cdouble>(jac, e, distinct, w, 1, step, 0.0); st < 0) return st;
        double ds = 0, zs = 0;
        for (int32_t r = 0; r < distinct; ++r) {
            roots[r] -= step[r];
            ds += Abs2(step[r]);
            zs += Abs2(roots[r]);
        }
        if (ds <= kEps * kEps * zs) {
            bestRes = kInf;  // take this last step too
            std::copy(roots, roots + distinct, v);
            break;
        }
    }
    // A structure whose best fit misses the polynomial by more than the divisor tolerance is
    // not the polynomial's: close simple roots had passed for a multiple one.
    product(v);
    for (int32_t k = 0; k <= e; ++k) w[k] = g[k] - target[k];
    if (!(Norm(w, e + 1) <= gcdTol * Norm(target, e + 1))) return NoConvergenceErr;
    std::copy(v, v + distinct, roots);
    *s = distinct;
    return 0;
}

}  // namespace

void PolyEvaluate(const double* c, int32_t nc, double* x, int32_t nx) {
    // Blocks of x go through the coefficients together; each x keeps its own order of operations.
    constexpr int32_t kBlock = 64;
    double y[kBlock], p[kBlock];
    for (int32_t start = 0; start < nx; start += kBlock) {
        const int32_t len = std::min(kBlock, nx - start);
        double* xb = x + start;
        for (int32_t j = 0; j < len; ++j) {
            y[j] = c[0];
            p[j] = 1.0;
        }
        for (int32_t i = 1; i < nc; ++i) {
            const double ci = c[i];
            for (int32_t j = 0; j < len; ++j) {
                p[j] *= xb[j];
                y[j] += ci * p[j];
            }
        }
        std::copy(y, y + len, xb);
    }
}

template <class T>
void PolyMultiply(const T* a, int32_t na, const T* b, int32_t nb, T* out) {
    // Each element is the dot product of the longer operand with the reversed shorter one; the
    // products are accumulated shifted row by row so that every element adds its terms in that
    // same order and the rows vectorise.
    const T* lng = nb <= na ? a : b;
    const T* sht = nb <= na ? b : a;
    const int32_t nl = std::max(na, nb), ns = std::min(na, nb);
    std::fill(out, out + (nl + ns - 1), T(0));
    for (int32_t j = ns - 1; j >= 0; --j) {
        const T sj = sht[j];
        T* o = out + j;
        for (int32_t i = 0; i < nl; ++i) o[i] += Mul(sj, lng[i]);
    }
}

double NewtonRefine(const double* c, const double* d, int32_t n, double x, int32_t limit, double tol) {
    double best = x, bestF = 1e30;
    double f = HornerReal(c, n, x);
    if (f == 0) return x;
    double fd = HornerReal(d, n - 1, x);
    double step = fd != 0 ? f / fd : 1.0;
    double last = std::fabs(step);
    int32_t stall = 0;
    for (int32_t it = 0; it < limit; ++it) {
        f = HornerReal(c, n, x);
        if (f == 0) return x;
        if (std::fabs(f) < bestF) {
            best = x;
            bestF = std::fabs(f);
            stall = 0;
        }
        fd = HornerReal(d, n - 1, x);
        if (fd != 0 && std::fabs(f / fd) < 5 * last) {
            step = f / fd;
            last = std::fabs(step);
        }
        if (x != 0 && (last / std::fabs(x) < tol || stall >= 5)) break;
        ++stall;
        x -= step;
    }
    return best;
}

// The two synthetic divisions in Chapra's recurrences, for the factor x^2 - u x - v.
void BairstowRefine(const double* a, int32_t n, cdouble p, cdouble q, int32_t limit, double tol, double* work,
                    cdouble* roots) {
    const int32_t d = n - 1;
    double u = p.real() + q.real();
    double v = -(p.real() * q.real() - p.imag() * q.imag());
    double* b = work;
    double* c = work + n;
    double r1 = 0.1, r2 = 0.1;
    if (std::fabs(v) > 1e12 * std::fabs(u)) r1 = 1.2;
    if (std::fabs(v) < 1e-12 * std::fabs(u)) r2 = 1.2;
    for (int32_t it = 1; it <= limit; ++it) {
        b[d] = a[d];
        b[d - 1] = a[d - 1] + u * b[d];
        for (int32_t i = d - 2; i >= 0; --i) b[i] = a[i] + u * b[i + 1] + v * b[i + 2];
        c[d] = b[d];
        c[d - 1] = b[d - 1] + u * c[d];
        for (int32_t i = d - 2; i >= 1; --i) c[i] = b[i] + u * c[i + 1] + v * c[i + 2];
        const double det = c[2] * c[2] - c[1] * c[3];
        double du = 1.0, dv = 1.0;
        if (det != 0) {
            du = (b[0] * c[3] - c[2] * b[1]) / det;
            dv = (c[1] * b[1] - b[0] * c[2]) / det;
        }
        const double n1 = RelativeChange(du, u, r1), n2 = RelativeChange(dv, v, r2);
        // A change that grew ends the loop before its step; one left as it was does not.
        if (n1 > r1 || n2 > r2) break;
        u += du;
        v += dv;
        r1 = n1;
        r2 = n2;
        if (n1 < tol && n2 < tol) break;
    }
    const double disc = 4 * v + u * u;
    if (disc >= 0) {
        roots[0] = (u + std::sqrt(disc)) * 0.5;
        roots[1] = (u - std::sqrt(disc)) * 0.5;
    } else {
        roots[0] = {u * 0.5, -0.5 * std::sqrt(-disc)};
        roots[1] = {u * 0.5, 0.5 * std::sqrt(-disc)};
    }
}

Status PolyRootsRefine(const double* c, int32_t n, const double* real, int32_t nr, int32_t newtonLimit,
                       double newtonTol, const cdouble* cx, int32_t nx, int32_t bairstowLimit,
                       double bairstowTol, cdouble* roots) {
    if (n < 1) return EmptyInputWarn;
    Scratch<double> work;
    if (work.Allocate(Sz(2 * n)) != 0) return OutOfMemoryErr;
    double* d = work.get();
    for (int32_t i = 1; i < n; ++i) d[i - 1] = c[i] * i;
    for (int32_t i = 0; i < nr; ++i) roots[i] = NewtonRefine(c, d, n, real[i], newtonLimit, newtonTol);
    cdouble* out = roots + nr;
    // Zero high coefficients change no synthetic division; they only hide a short polynomial.
    n = Degree(c, n) + 1;
    if (n < 4) {
        std::copy(cx, cx + nx, out);
        return 0;
    }
    // Pairs whose roots come out real are stored before the complex ones, each in start order.
    int32_t pairs = nx / 2, nReal = 0;
    for (int32_t pass = 0; pass < 2; ++pass)
        for (int32_t i = 0; i < pairs; ++i) {
            cdouble r[2];
            BairstowRefine(c, n, cx[2 * i], cx[2 * i + 1], bairstowLimit, bairstowTol, work.get(), r);
            const bool isReal = r[0].imag() == 0;
            if (isReal != (pass == 0)) continue;
            out[2 * nReal] = r[0];
            out[2 * nReal + 1] = r[1];
            ++nReal;
        }
    if (nx % 2 != 0) out[nx - 1] = cx[nx - 1];
    return 0;
}

Status CxPolyRoots(cdouble* c, int32_t n, int32_t limit, int32_t* count) {
    *count = 0;
    if (limit < 1) limit = 100;
    if (n < 1 || CxHasNonFinite(c, n)) return TermsBelowOneErr;
    n = Degree(c, n) + 1;
    if (n < 2) return TermsBelowOneErr;
    int32_t zeros = 0;
    while (c[zeros] == 0.0) ++zeros;
    const int32_t d = n - 1 - zeros;
    Scratch<cdouble> work;
    Scratch<double> mags;
    if (work.Allocate(2 * Sz(d + 1) + Sz(d)) != 0 || mags.Allocate(2 * Sz(d + 1)) != 0) return OutOfMemoryErr;
    cdouble* a = work.get();
    cdouble* orig = a + (d + 1);
    cdouble* r = orig + (d + 1);
    double* mag = mags.get();
    double* origMag = mag + (d + 1);
    // The search runs on an exactly rescaled copy, so that no coefficient range overflows it.
    const PowerScale ps = Balance(c + zeros, d);
    for (int32_t k = 0; k <= d; ++k) a[k] = orig[k] = ScaledCoefficient(c[zeros + k], k, ps);
    for (int32_t k = 0; k <= d; ++k) origMag[k] = Abs(orig[k]);
    int32_t deg = d, found = 0;
    for (; deg > 2; --deg) {
        const cdouble z = a[0] == 0.0 ? cdouble(0) : SearchRoot(a, deg, limit, mag);
        r[found++] = z;
        Deflate(a, deg, z);
    }
    if (deg == 2) {
        Quadratic(a[0], a[1], a[2], r + found);
        found += 2;
    } else if (deg == 1) {
        r[found++] = Divide(-a[0], a[1]);
    }
    // Polish on the undeflated polynomial, each step kept only while |p| falls and while it stays
    // within half the distance to the nearest other root (at a multiple root p' is noise, and a
    // wild step can land where |p| is smaller only because another root is there).
    for (int32_t i = 0; i < found; ++i) {
        cdouble z = r[i];
        double reach = kInf;
        for (int32_t j = 0; j < found; ++j)
            if (j != i) reach = std::min(reach, 0.5 * Abs(r[j] - z));
        Value v = Horner(orig, origMag, d, z);
        for (int32_t s = 0; s < 2 && v.dp != 0.0; ++s) {
            const cdouble next = z - Divide(v.p, v.dp);
            if (!(Abs(next - r[i]) <= reach)) break;
            const Value w = Horner(orig, origMag, d, next);
            if (!(Abs(w.p) < Abs(v.p))) break;
            z = next;
            v = w;
        }
        r[i] = z;
    }
    for (int32_t i = 0; i < found; ++i) {
        r[i] = Ldexp(r[i], ps.s);
        if (!Finite(r[i])) return NoConvergenceErr;
    }
    std::fill(c, c + zeros, cdouble(0));
    std::copy(r, r + found, c + zeros);
    *count = zeros + found;
    return 0;
}

template <class T>
Status PolyGcd(const T* a, int32_t na, const T* b, int32_t nb, double tol, T* g, int32_t* ng, T* u,
               int32_t* nu, T* v, int32_t* nv, double* residual) {
    *ng = *nu = *nv = 0;
    *residual = std::numeric_limits<double>::quiet_NaN();
    if (na < 1 || nb < 1) return EmptyArrayErr;
    if (Screen(a, na) || Screen(b, nb)) return NanInfErr;
    if (!(tol > 0)) tol = 1e-8;
    const int32_t da = Degree(a, na), db = Degree(b, nb);
    if (da < 0 && db < 0) return AllZeroCoefErr;
    if (da < 0 || db < 0) {
        // gcd(0, b) is b made monic.
        const T* p = da < 0 ? b : a;
        const int32_t dp = std::max(da, db);
        for (int32_t i = 0; i <= dp; ++i) g[i] = p[i] / p[dp];
        T* zeroSide = da < 0 ? u : v;
        T* other = da < 0 ? v : u;
        zeroSide[0] = 0.0;
        other[0] = p[dp];
        *ng = dp + 1;
        *nu = 1;
        *nv = 1;
        *residual = 0;
        return 0;
    }
    int32_t low = 0;
    while (low < da && low < db && a[low] == T(0) && b[low] == T(0)) ++low;
    const T* pa = a + low;
    const T* pb = b + low;
    const int32_t ea = da - low, eb = db - low;
    int32_t dg = 0;
    Scratch<T> core;
    if (core.Allocate(Sz(std::max(ea, eb) + 1)) != 0) return OutOfMemoryErr;
    if (ea == 0 || eb == 0) {
        core[0] = 1.0;
        std::copy(pa, pa + ea + 1, u);
        std::copy(pb, pb + eb + 1, v);
    } else {
        const bool swap = eb > ea;
        const Status s = swap ? GcdCore(pb, eb, pa, ea, tol, core.get(), &dg, v, u)
                              : GcdCore(pa, ea, pb, eb, tol, core.get(), &dg, u, v);
        if (s < 0) return s;
    }
    Scratch<T> prod;
    if (prod.Allocate(Sz(std::max(da, db) + 1)) != 0) return OutOfMemoryErr;
    for (int32_t pass = 0; pass < 2; ++pass) {
        std::fill(g, g + low, T(0));
        std::copy(core.get(), core.get() + dg + 1, g + low);
        *ng = low + dg + 1;
        *nu = ea - dg + 1;
        *nv = eb - dg + 1;
        double worst = 0;
        for (int32_t side = 0; side < 2; ++side) {
            const T* x = side == 0 ? a : b;
            const int32_t dx = side == 0 ? da : db;
            PolyMultiply(g, *ng, side == 0 ? u : v, side == 0 ? *nu : *nv, prod.get());
            for (int32_t i = 0; i <= dx; ++i) prod[Sz(i)] = x[i] - prod[Sz(i)];
            worst = std::max(worst, Norm(prod.get(), dx + 1) / Norm(x, dx + 1));
        }
        *residual = worst;
        // A divisor found on the normalised pair that does not divide the caller's operands (their
        // coefficient ranges hid it) gives way to the trivial one.
        if (worst <= 100 * tol) break;
        dg = 0;
        core[0] = 1.0;
        std::copy(pa, pa + ea + 1, u);
        std::copy(pb, pb + eb + 1, v);
    }
    return 0;
}

namespace {

// All roots as simple ones: the eigenvalues of the companion matrix of the rescaled copy, which
// split a cluster evenly about its centre.
Status CompanionRoots(const cdouble* p, int32_t e, PowerScale ps, cdouble* roots) {
    Scratch<cdouble> work;
    if (work.Allocate(Sz(e) * Sz(e) + Sz(e + 1)) != 0) return OutOfMemoryErr;
    cdouble* m = work.get();
    cdouble* q = m + Sz(e) * Sz(e);
    for (int32_t i = 0; i <= e; ++i) q[i] = ScaledCoefficient(p[i], i, ps);
    std::fill(m, m + Sz(e) * Sz(e), cdouble(0));
    for (int32_t j = 0; j < e; ++j) m[Sz(j)] = -Divide(q[e - 1 - j], q[e]);
    for (int32_t i = 1; i < e; ++i) m[Sz(i) * Sz(e) + Sz(i - 1)] = 1.0;
    if (const Status s = CxGeneralEigen(m, e, 0, roots, nullptr); s < 0)
        return s == OutOfMemoryErr ? s : NoConvergenceErr;
    for (int32_t i = 0; i < e; ++i) roots[i] = Ldexp(roots[i], ps.s);
    return 0;
}

// Conjugate pairs side by side, positive imaginary part first, exactly conjugate; a root without
// a closer conjugate partner than its own distance from the axis is real.
void PairConjugates(cdouble* roots, int32_t* mult, int32_t s) {
    for (int32_t i = 0; i < s; ++i) {
        const double im = std::fabs(roots[i].imag());
        int32_t pick = -1;
        double best = im;
        for (int32_t j = i + 1; j < s; ++j) {
            if (mult[j] != mult[i] || roots[j].imag() == 0 || (roots[j].imag() < 0) == (roots[i].imag() < 0))
                continue;
            const double dist = std::abs(roots[j] - std::conj(roots[i]));
            if (dist < best) {
                best = dist;
                pick = j;
            }
        }
        if (pick < 0) {
            roots[i] = roots[i].real();
            continue;
        }
        const cdouble avg = (roots[i] + std::conj(roots[pick])) * 0.5;
        const cdouble upper(avg.real(), std::fabs(avg.imag()));
        for (int32_t j = pick; j > i + 1; --j)
            std::swap(roots[j], roots[j - 1]), std::swap(mult[j], mult[j - 1]);
        roots[i] = upper;
        roots[i + 1] = std::conj(upper);
        ++i;
    }
}

// ||c - c[d] prod (x - r)^m|| / ||c||, formed on the exactly rescaled coefficients and roots (ps
// as c's own) and each difference scaled back, so that it overflows only where the true one does.
// g holds d + 1 elements.
template <class T>
double RootResidual(const T* c, int32_t d, const cdouble* roots, const int32_t* mult, int32_t s,
                    PowerScale ps, cdouble* g) {
    g[0] = 1.0;
    int32_t len = 1;
    for (int32_t r = 0; r < s; ++r) {
        const cdouble z = Ldexp(roots[r], -int64_t{ps.s});
        for (int32_t t = 0; t < mult[r] && len <= d; ++t) {
            g[len] = 0;
            for (int32_t j = len; j >= 1; --j) g[j] = g[j - 1] - Mul(z, g[j]);
            g[0] = -Mul(z, g[0]);
            ++len;
        }
    }
    const cdouble lead = ScaledCoefficient(c[d], d, ps);
    for (int32_t i = 0; i <= d; ++i)
        g[i] = Ldexp(ScaledCoefficient(c[i], i, ps) - Mul(lead, g[i]), int64_t{ps.shift} - int64_t{i} * ps.s);
    return Norm(g, d + 1) / Norm(c, d + 1);
}

}  // namespace

template <class T>
Status MultPolyRoots(const T* c, int32_t n, int32_t limit, double tol, cdouble* roots, int32_t* mult,
                     int32_t* count, double* residual) {
    *count = 0;
    *residual = std::numeric_limits<double>::quiet_NaN();
    if (n < 1) return EmptyArrayErr;
    if (Screen(c, n)) return TermsBelowOneErr;
    if (!(tol > 0)) tol = 1e-10;
    if (limit < 1) limit = 100;
    const int32_t d = Degree(c, n);
    if (d < 0) return AllZeroCoefErr;
    if (d == 0) return OrderNotPositiveErr;
    int32_t k = 0;
    while (c[k] == T(0)) ++k;
    const int32_t e = d - k;
    int32_t s = 0;
    if (k > 0) {
        roots[0] = 0;
        mult[0] = k;
        s = 1;
    }
    Scratch<cdouble> work;
    Scratch<int32_t> trialMult;
    if (work.Allocate(4 * Sz(d + 1)) != 0 || trialMult.Allocate(Sz(d + 1)) != 0) return OutOfMemoryErr;
    cdouble* p = work.get();
    cdouble* q = p + (d + 1);
    cdouble* g = q + (d + 1);
    cdouble* trial = g + (d + 1);
    int32_t* tm = trialMult.get();
    for (int32_t i = 0; i <= e; ++i) p[i] = c[k + i];
    const PowerScale ps = e >= 1 ? Balance(p, e) : PowerScale{0, 0};
    const PowerScale cps{
        ps.s, static_cast<int32_t>(std::clamp<int64_t>(ps.shift + int64_t{k} * ps.s, -100000, 100000))};
    std::copy(roots, roots + s, trial);
    std::copy(mult, mult + s, tm);
    cdouble* rs = trial + s;
    int32_t* ms = tm + s;
    // Each candidate set of roots is judged by its residual against the caller's polynomial.
    double res = kInf;
    int32_t found = 0;
    const auto consider = [&](int32_t f) {
        if constexpr (!kIsComplex<T>) PairConjugates(rs, ms, f);
        for (int32_t i = 0; i < f; ++i)
            if (!Finite(rs[i])) return;
        const double r = RootResidual(c, d, trial, tm, s + f, cps, g);
        if (!(r < res)) return;
        res = r;
        found = f;
        std::copy(rs, rs + f, roots + s);
        std::copy(ms, ms + f, mult + s);
    };
    if (e == 1) {
        rs[0] = Divide(-p[0], p[1]);
        ms[0] = 1;
        consider(1);
    } else if (e == 2) {
        Quadratic(p[0], p[1], p[2], rs);
        ms[0] = ms[1] = 1;
        if (rs[0] == rs[1]) ms[0] = 2;
        consider(rs[0] == rs[1] ? 1 : 2);
    } else if (e >= 3) {
        Status st = NoConvergenceErr;
        int32_t f = 0;
        for (int32_t attempt = 0; attempt < 2 && st != 0; ++attempt) {
            // First on the exactly rescaled copy; a non-finite intermediate there is retried once
            // on the plain monic copy.
            for (int32_t i = 0; i <= e; ++i)
                q[i] = attempt == 0 ? ScaledCoefficient(p[i], i, ps) : Divide(p[i], p[e]);
            bool ok = q[0] != 0.0;
            for (int32_t i = 0; i <= e; ++i) ok = ok && Finite(q[i]);
            if (!ok) continue;
            st = MultRootCore(q, e, limit, tol, rs, ms, &f);
            for (int32_t i = 0; st == 0 && i < f; ++i) rs[i] = Ldexp(rs[i], attempt == 0 ? ps.s : 0);
            if (st == OutOfMemoryErr) return st;
        }
        if (st == 0) consider(f);
        if (!(res <= 100 * tol)) {
            // No structure, or one that misses the polynomial: simple roots, from the companion
            // matrix (clusters split evenly) and from the root finder (wide coefficient ranges).
            if (const Status s2 = CompanionRoots(p, e, ps, rs); s2 == OutOfMemoryErr)
                return s2;
            else if (s2 == 0) {
                std::fill(ms, ms + e, 1);
                consider(e);
            }
            std::copy(p, p + e + 1, rs);
            if (const Status s2 = CxPolyRoots(rs, e + 1, limit, &f); s2 == OutOfMemoryErr)
                return s2;
            else if (s2 == 0) {
                std::fill(ms, ms + e, 1);
                consider(f);
            }
        }
    } else {
        res = RootResidual(c, d, roots, mult, s, PowerScale{0, 0}, g);
    }
    if (!std::isfinite(res)) return NoConvergenceErr;
    *residual = res;
    *count = s + found;
    return 0;
}

template void PolyMultiply<double>(const double*, int32_t, const double*, int32_t, double*);
template void PolyMultiply<cdouble>(const cdouble*, int32_t, const cdouble*, int32_t, cdouble*);
template Status PolyGcd<double>(const double*, int32_t, const double*, int32_t, double, double*, int32_t*,
                                double*, int32_t*, double*, int32_t*, double*);
template Status PolyGcd<cdouble>(const cdouble*, int32_t, const cdouble*, int32_t, double, cdouble*, int32_t*,
                                 cdouble*, int32_t*, cdouble*, int32_t*, double*);
template Status MultPolyRoots<double>(const double*, int32_t, int32_t, double, cdouble*, int32_t*, int32_t*,
                                      double*);
template Status MultPolyRoots<cdouble>(const cdouble*, int32_t, int32_t, double, cdouble*, int32_t*, int32_t*,
                                       double*);

}  // namespace tw
