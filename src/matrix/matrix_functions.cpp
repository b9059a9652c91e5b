#include "matrix/matrix_functions.hpp"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>

#include "matrix/decompose.hpp"
#include "matrix/eigen.hpp"
#include "matrix/lapack.hpp"
#include "matrix/solve.hpp"

namespace tw {

namespace {

size_t Square(int32_t n) { return static_cast<size_t>(n) * static_cast<size_t>(n); }

template <class T> void Identity(T* a, int32_t n) {
    std::fill(a, a + Square(n), T(0));
    for (int32_t i = 0; i < n; ++i) a[static_cast<size_t>(i) * n + i] = T(1);
}

template <class T> bool OffDiagonalZero(const T* a, int32_t n) {
    for (int32_t i = 0; i < n; ++i)
        for (int32_t j = 0; j < n; ++j)
            if (i != j && a[static_cast<size_t>(i) * n + j] != T(0)) return false;
    return true;
}

template <class T> Status Product(const T* a, const T* b, int32_t n, T* c) { return MatMul<T>(a, b, n, n, n, c, 0); }

double ExpOf(double x) { return std::exp(x); }
double ScaleByPowerOf2(double x, int32_t e) { return std::ldexp(x, e); }
cdouble ScaleByPowerOf2(cdouble z, int32_t e) { return {std::ldexp(z.real(), e), std::ldexp(z.imag(), e)}; }
cdouble ExpOf(cdouble z) {
    const double e = std::exp(z.real());
    return {e * std::cos(z.imag()), e * std::sin(z.imag())};
}

double MaxMagnitude(const cdouble* a, size_t count) {
    double m = 0;
    for (size_t i = 0; i < count; ++i) m = std::max(m, std::abs(a[i]));
    return m;
}

// The Pade order for tol 1e-8 from the unscaled norm; exp(norm) may overflow so that the loop
// runs until e underflows.
int32_t PadeOrder(double norm) {
    const double tol = 1e-8;
    const double ratio = tol / (std::exp(norm) * norm);
    double e = 1.0 / 6.0, p = 3.0;
    int32_t q = 1, k = 2;
    while (e * std::exp(e) > ratio) {
        k += 2;
        q += 1;
        double v = e * p * static_cast<double>(q * q);
        for (int32_t i = static_cast<int32_t>(p); i <= k; ++i) v /= static_cast<double>(i) * i;
        p = k + 1;
        e = 0.25 * v / p;
    }
    return q;
}

}  // namespace

// Pade approximation with scaling and squaring (Golub and Van Loan).
template <class T> Status MatrixExp(T* a, int32_t n) {
    if (n < 1) return EmptyArrayErr;
    // An infinite norm would make the number of squarings undefined.
    if (Screen(a, n * n)) return NanInfErr;
    const size_t nn = Square(n);
    if (OffDiagonalZero(a, n)) {
        for (int32_t i = 0; i < n; ++i) a[static_cast<size_t>(i) * n + i] = ExpOf(a[static_cast<size_t>(i) * n + i]);
        return 0;
    }
    Scratch<T> work;
    Scratch<int32_t> perm;
    if (work.Allocate(4 * nn) != 0 || perm.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    T *num = work.get(), *den = num + nn, *x = den + nn, *spare = x + nn;
    double norm = 0;
    for (int32_t i = 0; i < n; ++i) {
        double row = 0;
        for (int32_t j = 0; j < n; ++j) row += Magnitude(a[static_cast<size_t>(i) * n + j]);
        norm = std::max(norm, row);
    }
    int32_t s = 0;
    if (norm >= 0.5) {
        // A row sum of finite entries can still overflow; n entries below 2^1024 sum below 2^(1024 + log2 n).
        const double bits = std::isfinite(norm) ? std::log(norm) / std::log(2.0)
                                                : 1024.0 + std::log2(static_cast<double>(n));
        s = static_cast<int32_t>(bits + 1.0);
        // Division by 2^s through the exponent, so that s = 1025 (2^s not representable) still scales.
        for (size_t i = 0; i < nn; ++i) a[i] = ScaleByPowerOf2(a[i], -s);
    }
    for (size_t i = 0; i < nn; ++i) {
        num[i] = a[i] / 2.0;
        den[i] = -a[i] / 2.0;
    }
    for (int32_t i = 0; i < n; ++i) {
        num[static_cast<size_t>(i) * n + i] += 1.0;
        den[static_cast<size_t>(i) * n + i] += 1.0;
    }
    double c = 0.5, sign = 1.0;
    Status st = Product(a, a, n, x);
    const int32_t q = PadeOrder(norm);
    for (int32_t k = 2; k <= q && st == 0; ++k) {
        c = c * (q - k + 1) / (static_cast<double>(2 * q - k + 1) * k);
        for (size_t i = 0; i < nn; ++i) {
            num[i] += c * x[i];
            den[i] += sign * c * x[i];
        }
        if (k == q) break;
        st = Product(x, a, n, spare);
        std::swap(x, spare);
        sign = -sign;
    }
    if (st == 0) {
        int32_t parity = 0;
        const Status lu = LuFactorSquare(den, n, perm.get(), &parity);
        const Status inv = LuInverse(den, perm.get(), n, den);
        if constexpr (kIsComplex<T>) st = lu == SingularPivotWarn ? SingularMatrixErr : lu != 0 ? lu : inv;
    }
    // R = D^-1 N, then s squarings alternating between two blocks.
    if (st == 0) st = Product(den, num, n, x);
    for (int32_t k = 0; k < s && st == 0; ++k) {
        st = Product(x, x, n, spare);
        std::swap(x, spare);
    }
    if (st == 0) std::copy(x, x + nn, a);
    return MergeRelease(MergeRelease(st, work.Release()), perm.Release());
}

namespace {

// A Schur diagonal or eigenvalue of a real matrix on the negative axis, with an imaginary part
// of rounding size: its complex copy may carry -0 or -4e-17, which would select the lower branch.
cdouble OnUpperSide(cdouble l, int32_t realInput) {
    if (realInput != 0 && l.real() < 0 && std::fabs(l.imag()) <= 1e-12 * std::abs(l)) return {l.real(), 0.0};
    return l;
}

double Frobenius(const cdouble* a, size_t count) {
    double s = 0;
    for (size_t i = 0; i < count; ++i) s += Abs2(a[i]);
    return std::sqrt(s);
}

// L = V diag(ln lambda) V^-1. -20073 for an ill-conditioned V, -20060 for a zero eigenvalue. A V
// whose LU meets a zero pivot though its condition passed is inverted through the pseudo-inverse,
// and the verification of the caller decides.
Status EigenLog(const cdouble* a, int32_t n, cdouble* out, int32_t realInput) {
    const size_t nn = Square(n);
    Scratch<cdouble> work;
    if (work.Allocate(3 * nn + static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    cdouble *v = work.get(), *vi = v + nn, *t = vi + nn, *w = t + nn;
    Status s = CxGeneralEigen(a, n, 1, w, v);
    double k2 = 0;
    if (s == 0) s = ConditionNumber<cdouble>(v, n, n, 0, &k2);
    if (s == 0 && (std::isinf(k2) || k2 > 1e14)) s = FactorisationFailedErr;
    for (int32_t i = 0; i < n && s == 0; ++i) {
        const cdouble l = OnUpperSide(w[i], realInput);
        const double m2 = l.real() * l.real() + l.imag() * l.imag();
        if (m2 == 0) s = DivideByZeroErr;
        w[i] = {0.5 * std::log(m2), std::atan2(l.imag(), l.real())};
    }
    if (s == 0) {
        std::copy(v, v + nn, vi);
        if (InvertByLu(vi, n) != 0) s = PseudoInverse<cdouble>(v, n, n, -1.0, vi);
    }
    if (s == 0) {
        for (int32_t i = 0; i < n; ++i)
            for (int32_t j = 0; j < n; ++j) t[static_cast<size_t>(i) * n + j] = v[static_cast<size_t>(i) * n + j] * w[j];
        s = Product(t, vi, n, out);
    }
    return MergeRelease(s, work.Release());
}

// err = max |A - E| / (max |E| + max |A|) with E = exp(l), left in e.
Status ExpError(const cdouble* a, const cdouble* l, int32_t n, cdouble* e, double* err) {
    const size_t nn = Square(n);
    std::copy(l, l + nn, e);
    const Status s = MatrixExp<cdouble>(e, n);
    if (s != 0) return s;
    double d = 0;
    for (size_t i = 0; i < nn; ++i) d = std::max(d, std::abs(a[i] - e[i]));
    *err = d / (MaxMagnitude(e, nn) + MaxMagnitude(a, nn));
    return 0;
}

}  // namespace

Status CxMatrixSqrt(const cdouble* a, int32_t n, cdouble* out, int32_t realInput) {
    if (n < 1) return EmptyArrayErr;
    const size_t nn = Square(n);
    Scratch<cdouble> work;
    if (work.Allocate(4 * nn + static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    cdouble *q = work.get(), *t = q + nn, *r = t + nn, *qr = r + nn, *w = qr + nn;
    Status s = CxSchurDecomp(a, n, 4, nullptr, nullptr, q, t, w);
    if (s == 0 && n > 1 && std::fabs(w[n - 2].real()) + std::fabs(w[n - 2].imag()) < 1e-12)
        s = MatrixFunctionAccuracyWarn;
    if (s >= 0) {
        std::fill(r, r + nn, cdouble(0));
        const auto at = [n](int32_t i, int32_t j) { return static_cast<size_t>(i) * n + j; };
        // Column j of R is built upwards in col, so that the inner products run over contiguous
        // memory; the products are written out in real arithmetic, rounding as num -= a b does.
        cdouble* col = qr;
        for (int32_t j = 0; j < n; ++j) {
            col[j] = std::sqrt(OnUpperSide(t[at(j, j)], realInput));
            r[at(j, j)] = col[j];
            for (int32_t i = j - 1; i >= 0; --i) {
                double sr = t[at(i, j)].real(), si = t[at(i, j)].imag();
                const cdouble* ri = r + at(i, 0);
                for (int32_t k = i + 1; k < j; ++k) {
                    const double ar = ri[k].real(), ai = ri[k].imag(), br = col[k].real(), bi = col[k].imag();
                    sr -= ar * br - ai * bi;
                    si -= ar * bi + ai * br;
                }
                const cdouble num(sr, si), d = r[at(i, i)] + col[j];
                const bool tiny = std::fabs(d.real()) + std::fabs(d.imag()) < 1e-12 &&
                                  std::fabs(num.real()) + std::fabs(num.imag()) < 1e-12;
                col[i] = tiny ? cdouble(0) : Divide(num, d);
                r[at(i, j)] = col[i];
            }
        }
        const Status p = CxMatMul(q, r, n, n, n, qr, 0);
        if (p != 0) {
            s = p;
        } else {
            const cdouble one = 1.0, zero = 0.0;
            cblas_zgemm(CblasRowMajor, CblasNoTrans, CblasConjTrans, n, n, n, &one, qr, n, q, n, &zero, out, n);
        }
    }
    return MergeRelease(s, work.Release());
}

Status MatrixLogByRoots(const cdouble* a, int32_t n, cdouble* out, int32_t terms, double threshold,
                        int32_t realInput) {
    const size_t nn = Square(n);
    Scratch<cdouble> work;
    if (work.Allocate(3 * nn) != 0) return OutOfMemoryErr;
    cdouble *r = work.get(), *y = r + nn, *p = y + nn;
    std::copy(a, a + nn, r);
    const auto minusIdentity = [&](double sign) {
        for (size_t i = 0; i < nn; ++i) y[i] = sign * r[i];
        for (int32_t i = 0; i < n; ++i) y[static_cast<size_t>(i) * n + i] -= sign;
    };
    minusIdentity(1.0);
    double d = Frobenius(y, nn);
    int32_t k = 0;
    Status s = 0;
    while (d > threshold && k < 100 && s >= 0) {
        s = CxMatrixSqrt(r, n, p, realInput);
        std::copy(p, p + nn, r);
        minusIdentity(1.0);
        d = Frobenius(y, nn);
        k += 1;
    }
    if (s < 0) return MergeRelease(s, work.Release());
    // A root that went non-finite ends the loop as well.
    if (!(d <= threshold)) return MergeRelease(NoConvergenceErr, work.Release());
    // ln(R) = ln(I - Y) = -(Y + Y^2/2 + ...), Y = I - R.
    minusIdentity(-1.0);
    std::copy(y, y + nn, out);
    std::copy(y, y + nn, p);
    s = 0;
    for (int32_t j = 2; j <= terms && s == 0; ++j) {
        s = Product(p, y, n, r);
        std::copy(r, r + nn, p);
        for (size_t i = 0; i < nn; ++i) out[i] += p[i] / static_cast<double>(j);
    }
    const double f = -std::ldexp(1.0, k);
    for (size_t i = 0; i < nn; ++i) out[i] *= f;
    return MergeRelease(s, work.Release());
}

Status CxMatrixLog(const cdouble* a, int32_t n, cdouble* out, int32_t realInput) {
    if (n < 1) return EmptyArrayErr;
    const size_t nn = Square(n);
    const auto lnOf = [realInput](cdouble z, cdouble* r) -> Status {
        const cdouble l = OnUpperSide(z, realInput);
        const double m2 = l.real() * l.real() + l.imag() * l.imag();
        if (m2 == 0) return DivideByZeroErr;
        *r = {0.5 * std::log(m2), std::atan2(l.imag(), l.real())};
        return 0;
    };
    if (OffDiagonalZero(a, n)) {
        std::fill(out, out + nn, cdouble(0));
        for (int32_t i = 0; i < n; ++i)
            if (const Status s = lnOf(a[static_cast<size_t>(i) * n + i], &out[static_cast<size_t>(i) * n + i])) return s;
        return 0;
    }
    Status s = EigenLog(a, n, out, realInput);
    if (s == DivideByZeroErr || s == FactorisationFailedErr) {
        const Status fallback = MatrixLogByRoots(a, n, out, 10, 0.1, realInput);
        if (fallback < 0) return DivideByZeroErr;
        return s == DivideByZeroErr ? SingularPivotWarn : 0;
    }
    if (s != 0) return s;

    Scratch<cdouble> work;
    if (work.Allocate(5 * nn) != 0) return OutOfMemoryErr;
    cdouble *e = work.get(), *best = e + nn, *l = best + nn, *c = l + nn, *inv = c + nn;
    double err = 0;
    s = ExpError(a, out, n, e, &err);
    if (s == 0 && err < 1e-12) return MergeRelease(0, work.Release());
    if (s != 0) return MergeRelease(s, work.Release());
    std::copy(out, out + nn, best);
    double bestErr = err;

    // Perturbation by a logistic sequence, element by element.
    double x = 0.142857;
    for (size_t i = 0; i < nn; ++i) {
        x = 4 * x * (1 - x);
        const double re = a[i].real() + x * 1e-12 / n;
        x = 4 * x * (1 - x);
        c[i] = {re, a[i].imag() + x * 1e-12 / n};
    }
    if (EigenLog(c, n, l, realInput) == 0 && ExpError(a, l, n, e, &err) == 0) {
        if (err < 1e-12) {
            std::copy(l, l + nn, out);
            return MergeRelease(0, work.Release());
        }
        if (err < bestErr) {
            std::copy(l, l + nn, best);
            bestErr = err;
        }
    }

    // Newton correction from the best: L -= (E - A) E^-1.
    std::copy(best, best + nn, l);
    bool done = ExpError(a, l, n, e, &err) != 0;
    for (int32_t pass = 0; pass < 2 && !done; ++pass) {
        std::copy(e, e + nn, inv);
        if (InvertByLu(inv, n) != 0) break;
        for (size_t i = 0; i < nn; ++i) e[i] -= a[i];
        if (Product(e, inv, n, c) != 0 || CxHasNonFinite(c, static_cast<int32_t>(nn))) break;
        bool small = true;
        for (size_t i = 0; i < nn; ++i) {
            l[i] -= c[i];
            small = small && std::fabs(c[i].real()) <= 1e-12 * std::fabs(l[i].real()) &&
                    std::fabs(c[i].imag()) <= 1e-12 * std::fabs(l[i].imag());
        }
        if (small) {
            std::copy(l, l + nn, out);
            return MergeRelease(0, work.Release());
        }
        if (ExpError(a, l, n, e, &err) != 0) break;
        if (err < 1e-12) {
            std::copy(l, l + nn, out);
            return MergeRelease(0, work.Release());
        }
        if (!(err < bestErr)) break;
        std::copy(l, l + nn, best);
        bestErr = err;
    }
    std::copy(best, best + nn, out);
    return MergeRelease(MatrixFunctionAccuracyWarn, work.Release());
}

template <class T> Status MatrixPower(T* a, int32_t n, int32_t power) {
    if (n < 1) return EmptyArrayErr;
    const size_t nn = Square(n);
    Scratch<T> work;
    if (work.Allocate(3 * nn) != 0) return OutOfMemoryErr;
    T *base = work.get(), *acc = base + nn, *spare = acc + nn;
    Status s = 0;
    int64_t p = power;
    if (p < 0) {
        s = PseudoInverse<T>(a, n, n, -1.0, base);
        p = -p;
    } else {
        std::copy(a, a + nn, base);
    }
    if (s == 0 && p == 0) Identity(a, n);
    if (s == 0 && p == 1) std::copy(base, base + nn, a);
    if (s == 0 && p >= 2) {
        // Binary powers from the low bit; blocks rotate, the result is copied once at the end.
        bool have = false;
        while (s == 0) {
            if (p & 1) {
                if (have) {
                    s = Product(acc, base, n, spare);
                    std::swap(acc, spare);
                } else {
                    std::copy(base, base + nn, acc);
                    have = true;
                }
            }
            p >>= 1;
            if (p == 0) break;
            s = Product(base, base, n, spare);
            std::swap(base, spare);
        }
        if (s == 0) std::copy(acc, acc + nn, a);
    }
    return MergeRelease(s, work.Release());
}

template <class T> Status CharacteristicPoly(const T* a, int32_t n, cdouble* c) {
    if (n < 1) return EmptyArrayErr;
    Scratch<cdouble> w;
    if (w.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    Status s;
    if constexpr (kIsComplex<T>)
        s = CxGeneralEigen(a, n, 0, w.get(), nullptr);
    else
        s = GeneralEigen(a, n, 0, w.get(), nullptr);
    if (s == 0) PolyFromRoots(w.get(), n, c);
    return MergeRelease(s, w.Release());
}

template <class T> void KroneckerProduct(const T* a, int32_t m, int32_t n, const T* b, int32_t p, int32_t q, T* c) {
    const size_t cols = static_cast<size_t>(n) * static_cast<size_t>(q);
    for (int32_t i = 0; i < m; ++i)
        for (int32_t r = 0; r < p; ++r) {
            T* __restrict row = c + (static_cast<size_t>(i) * p + r) * cols;
            const T* __restrict brow = b + static_cast<size_t>(r) * q;
            for (int32_t j = 0; j < n; ++j) {
                const T aij = a[static_cast<size_t>(i) * n + j];
                T* __restrict dst = row + static_cast<size_t>(j) * q;
                for (int32_t s = 0; s < q; ++s) dst[s] = aij * brow[s];
            }
        }
}

Status SpecialMatrixShape(int32_t type, int32_t size, int32_t nx, int32_t ny, int32_t* rows, int32_t* cols) {
    switch (type) {
        case 0: *rows = *cols = size; break;
        case 1:
        case 3: *rows = *cols = nx; break;
        case 2:
            *rows = nx;
            *cols = ny;
            break;
        case 4:
            *rows = *cols = nx - 1;
            return nx - 1 < 1 ? TooFewSamples2Err : 0;
        default: return InvalidSelectorErr;
    }
    return *rows < 1 || *cols < 1 ? EmptyArrayErr : 0;
}

template <class T>
void SpecialMatrix(int32_t type, const T* x, int32_t nx, const T* y, int32_t rows, int32_t cols, T* out) {
    const size_t count = static_cast<size_t>(rows) * static_cast<size_t>(cols);
    std::fill(out, out + count, T(0));
    const auto at = [cols](int32_t i, int32_t j) { return static_cast<size_t>(i) * cols + j; };
    switch (type) {
        case 0: Identity(out, rows); break;
        case 1:
            for (int32_t i = 0; i < rows; ++i) out[at(i, i)] = x[i];
            break;
        case 2:
            for (int32_t i = 0; i < rows; ++i)
                for (int32_t j = 0; j < cols; ++j) out[at(i, j)] = j <= i ? x[i - j] : y[j - i];
            break;
        case 3:
            for (int32_t i = 0; i < rows; ++i) {
                out[at(i, cols - 1)] = T(1);
                for (int32_t j = cols - 2; j >= 0; --j) out[at(i, j)] = out[at(i, j + 1)] * x[i];
            }
            break;
        case 4:
            for (int32_t i = 1; i < rows; ++i) out[at(i, i - 1)] = T(1);
            for (int32_t j = 0; j < cols && j + 1 < nx; ++j) out[at(0, j)] = Divide(-x[j + 1], x[0]);
            break;
        default: break;
    }
}

int32_t AutoCorrRows(int32_t type, int32_t n, int32_t m) {
    switch (type) {
        case 0: return static_cast<int32_t>(std::min<int64_t>(int64_t{n} + m, INT32_MAX));
        case 1:
        case 2: return n;
        case 3: return n - m;
        case 4: return static_cast<int32_t>(std::min<int64_t>(2 * (int64_t{n} - m), INT32_MAX));
        default: return -1;
    }
}

template <class T>
Status AutoCorrMatrix(const T* x, int32_t n, T* prev, int32_t m, int32_t type, int32_t count, T* r, T* xm) {
    const int32_t w = m + 1;
    Scratch<T> tail;
    if (tail.Allocate(static_cast<size_t>(w)) != 0) return OutOfMemoryErr;
    const auto at = [w](int32_t i, int32_t j) { return static_cast<size_t>(i) * w + j; };
    // Sample k of the joined record: prev before x on a continuing block, zeros on a first one.
    const auto sample = [&](int32_t k) -> T {
        if (k >= n) return T(0);
        if (k >= 0) return x[k];
        return count > 0 && k >= -m ? prev[m + k] : T(0);
    };
    const auto fill = [&](int32_t row, int32_t t, bool backward, double f) {
        for (int32_t j = 0; j < w; ++j)
            xm[at(row, j)] = backward ? Conj(sample(t - m + j)) * f : sample(t - j) * f;
    };
    if (count == 0) {
        const int32_t rows = AutoCorrRows(type, n, m);
        const double f = 1.0 / std::sqrt(static_cast<double>(rows));
        const int32_t first = (type == 0 || type == 1) ? 0 : m;
        const int32_t forward = type == 4 ? rows / 2 : rows;
        for (int32_t i = 0; i < forward; ++i) fill(i, first + i, false, f);
        if (type == 4)
            for (int32_t i = 0; i < forward; ++i) fill(forward + i, first + i, true, f);
        for (int32_t i = 0; i < w; ++i)
            for (int32_t j = 0; j < w; ++j) {
                T s = 0;
                for (int32_t k = 0; k < rows; ++k) s += Conj(xm[at(k, i)]) * xm[at(k, j)];
                r[at(i, j)] = s;
            }
    } else {
        // The rows of the new times of the joined record, whatever the type: count R plus their
        // products, divided by the new count. xm gets the rows scaled to that count.
        const double total = static_cast<double>(count) + n, f = 1.0 / std::sqrt(total);
        for (int32_t i = 0; i < n; ++i) fill(i, i, false, f);
        for (int32_t i = 0; i < w; ++i)
            for (int32_t j = 0; j < w; ++j) {
                T s = r[at(i, j)] * static_cast<double>(count);
                for (int32_t t = 0; t < n; ++t) s += Conj(sample(t - i)) * sample(t - j);
                r[at(i, j)] = s / total;
            }
    }
    // prev keeps the last m samples of the joined record.
    for (int32_t k = 0; k < m; ++k) tail[k] = n - m + k >= 0 ? x[n - m + k] : (count > 0 ? prev[n + k] : T(0));
    std::copy(tail.get(), tail.get() + m, prev);
    return tail.Release();
}

template <class T>
Status CheckSymmetric(const T* a, int32_t n, double tol, int32_t relative, int32_t hermitian, int32_t* result) {
    *result = 0;
    if (n < 1) return EmptyArrayErr;
    if (Screen(a, n * n)) return NanInfErr;
    const size_t nn = Square(n);
    double threshold = std::max(tol, 0.0);
    if (relative != 0) {
        double big = 0;
        for (size_t i = 0; i < nn; ++i) big = std::max(big, Magnitude(a[i]));
        threshold = tol >= 0 ? n * tol * big : n * kEps * big;
    }
    for (int32_t i = 0; i < n; ++i)
        for (int32_t j = i + 1; j < n; ++j) {
            const T u = a[static_cast<size_t>(i) * n + j], l = a[static_cast<size_t>(j) * n + i];
            if constexpr (kIsComplex<T>) {
                const T v = hermitian != 0 ? std::conj(l) : l;
                if (std::max(std::fabs(u.real() - v.real()), std::fabs(u.imag() - v.imag())) > threshold) return 0;
            } else {
                if (std::fabs(u - l) > threshold) return 0;
            }
        }
    if constexpr (kIsComplex<T>) {
        if (hermitian != 0)
            for (int32_t i = 0; i < n; ++i)
                if (std::fabs(a[static_cast<size_t>(i) * n + i].imag()) > threshold) return 0;
    }
    *result = 1;
    return 0;
}

template <class T> Status CheckPositiveDefinite(const T* a, int32_t n, int32_t* result) {
    *result = 0;
    if (n < 1) return EmptyArrayErr;
    if (Screen(a, n * n)) return NanInfErr;
    for (int32_t i = 0; i < n; ++i)
        for (int32_t j = i; j < n; ++j)
            if (a[static_cast<size_t>(i) * n + j] != Conj(a[static_cast<size_t>(j) * n + i])) return 0;
    Scratch<T> values;
    if (values.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    Status s;
    if constexpr (kIsComplex<T>)
        s = HermitianEigen(a, n, 0, values.get(), nullptr);
    else
        s = SymmetricEigen(a, n, 0, values.get(), nullptr);
    if (s == 0) {
        const double big = std::max(Magnitude(values[0]), Magnitude(values[static_cast<size_t>(n) - 1]));
        bool all = true;
        for (int32_t i = 0; i < n; ++i) all = all && std::real(values[i]) > big * kEps;
        *result = all ? 1 : 0;
    }
    return MergeRelease(s, values.Release());
}

// Gaussian elimination with diagonal pivoting. Diagonals below -threshold count as negative, and
// a pivot at or below the threshold demands off-diagonals at most the threshold: a literal test
// against 0 and the pivot would fail rank-deficient Gram matrices on rounding noise alone.
template <class T> Status CheckPositiveSemiDefinite(const T* a, int32_t n, double tol, int32_t* result, int32_t* rank) {
    *result = 0;
    *rank = -1;
    if (n < 1) return EmptyArrayErr;
    if (Screen(a, n * n)) return NanInfErr;
    const size_t nn = Square(n);
    Scratch<T> work;
    if (work.Allocate(nn) != 0) return OutOfMemoryErr;
    T* w = work.get();
    std::copy(a, a + nn, w);
    const auto at = [n](int32_t i, int32_t j) { return static_cast<size_t>(i) * n + j; };
    double threshold = 0;
    int32_t found = 0;
    for (int32_t k = 0; k < n; ++k) {
        int32_t big = k;
        double lo = std::real(w[at(k, k)]);
        for (int32_t i = k + 1; i < n; ++i) {
            if (std::real(w[at(i, i)]) > std::real(w[at(big, big)])) big = i;
            lo = std::min(lo, std::real(w[at(i, i)]));
        }
        if (k == 0) {
            threshold = n * (tol < 0 ? kEps : tol) * std::real(w[at(big, big)]);
            if (lo < -threshold) return MergeRelease(0, work.Release());
            int32_t sym = 0;
            const Status s = CheckSymmetric(a, n, threshold, 0, 1, &sym);
            if (s != 0 || sym == 0) return MergeRelease(s, work.Release());
        } else if (lo < -threshold) {
            return MergeRelease(0, work.Release());
        }
        if (k == n - 1) {
            if (std::real(w[at(k, k)]) > threshold) ++found;
            break;
        }
        if (big != k) {
            for (int32_t j = 0; j < n; ++j) std::swap(w[at(k, j)], w[at(big, j)]);
            for (int32_t i = 0; i < n; ++i) std::swap(w[at(i, k)], w[at(i, big)]);
        }
        const double pivot = std::real(w[at(k, k)]);
        if (pivot > threshold) {
            for (int32_t i = k + 1; i < n; ++i) {
                const T f = w[at(i, k)] / pivot;
                for (int32_t j = k + 1; j < n; ++j) w[at(i, j)] -= f * Conj(w[at(j, k)]);
            }
            ++found;
        } else {
            for (int32_t j = k + 1; j < n; ++j) {
                const T e = w[at(k, j)];
                bool ok;
                if constexpr (kIsComplex<T>)
                    ok = std::fabs(e.real()) <= threshold && std::fabs(e.imag()) <= threshold;
                else
                    ok = std::fabs(e) <= threshold;
                if (!ok) return MergeRelease(0, work.Release());
            }
        }
    }
    *result = 1;
    *rank = found;
    return work.Release();
}

#define TW_MATRIX_FUNCTIONS(T)                                                                              \
    template Status MatrixExp<T>(T*, int32_t);                                                              \
    template Status MatrixPower<T>(T*, int32_t, int32_t);                                                   \
    template Status CharacteristicPoly<T>(const T*, int32_t, cdouble*);                                     \
    template void KroneckerProduct<T>(const T*, int32_t, int32_t, const T*, int32_t, int32_t, T*);          \
    template void SpecialMatrix<T>(int32_t, const T*, int32_t, const T*, int32_t, int32_t, T*);             \
    template Status AutoCorrMatrix<T>(const T*, int32_t, T*, int32_t, int32_t, int32_t, T*, T*);            \
    template Status CheckSymmetric<T>(const T*, int32_t, double, int32_t, int32_t, int32_t*);               \
    template Status CheckPositiveDefinite<T>(const T*, int32_t, int32_t*);                                  \
    template Status CheckPositiveSemiDefinite<T>(const T*, int32_t, double, int32_t*, int32_t*);
TW_MATRIX_FUNCTIONS(double)
TW_MATRIX_FUNCTIONS(cdouble)
#undef TW_MATRIX_FUNCTIONS

}  // namespace tw
