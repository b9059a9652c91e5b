// The library's own eigenvalue iterations: tridiagonal QL for symmetric and Hermitian matrices,
// balancing, elimination and double-shift QR for real matrices, single-shift complex QR, and the
// polynomial built from its roots.
#include "matrix/eigen.hpp"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace tw {

namespace {

inline size_t Ix(int32_t i, int32_t j, int32_t n) { return static_cast<size_t>(i) * static_cast<size_t>(n) + static_cast<size_t>(j); }
inline size_t Square(int32_t n) { return static_cast<size_t>(n) * static_cast<size_t>(n); }

// Householder tridiagonalisation of the lower triangle of z (row-major n by n). d gets the
// diagonal, e[i] the element between i-1 and i (e[0] = 0). With vectors z becomes the orthogonal
// factor, else its content is left as work.
void Tred2(double* z, int32_t n, bool vectors, double* d, double* e) {
    const auto Z = [&](int32_t i, int32_t j) -> double& { return z[Ix(i, j, n)]; };
    for (int32_t i = n - 1; i > 0; --i) {
        const int32_t l = i - 1;
        double h = 0, scale = 0;
        if (l > 0) {
            for (int32_t k = 0; k < i; ++k) scale += std::fabs(Z(i, k));
            if (scale == 0) {
                e[i] = Z(i, l);
            } else {
                for (int32_t k = 0; k < i; ++k) {
                    Z(i, k) /= scale;
                    h += Z(i, k) * Z(i, k);
                }
                double f = Z(i, l);
                double g = f >= 0 ? -std::sqrt(h) : std::sqrt(h);
                e[i] = scale * g;
                h -= f * g;
                Z(i, l) = f - g;
                f = 0;
                for (int32_t j = 0; j < i; ++j) {
                    if (vectors) Z(j, i) = Z(i, j) / h;
                    g = 0;
                    for (int32_t k = 0; k <= j; ++k) g += Z(j, k) * Z(i, k);
                    for (int32_t k = j + 1; k < i; ++k) g += Z(k, j) * Z(i, k);
                    e[j] = g / h;
                    f += e[j] * Z(i, j);
                }
                const double hh = f / (h + h);
                for (int32_t j = 0; j < i; ++j) {
                    f = Z(i, j);
                    e[j] = g = e[j] - hh * f;
                    for (int32_t k = 0; k <= j; ++k) Z(j, k) -= f * e[k] + g * Z(i, k);
                }
            }
        } else {
            e[i] = Z(i, l);
        }
        d[i] = h;
    }
    d[0] = 0;
    e[0] = 0;
    for (int32_t i = 0; i < n; ++i) {
        if (vectors) {
            if (d[i] != 0) {
                for (int32_t j = 0; j < i; ++j) {
                    double g = 0;
                    for (int32_t k = 0; k < i; ++k) g += Z(i, k) * Z(k, j);
                    for (int32_t k = 0; k < i; ++k) Z(k, j) -= g * Z(k, i);
                }
            }
            d[i] = Z(i, i);
            Z(i, i) = 1;
            for (int32_t j = 0; j < i; ++j) Z(j, i) = Z(i, j) = 0;
        } else {
            d[i] = Z(i, i);
        }
    }
}

// Implicit QL on the tridiagonal (d, e), e[i] between i and i+1, e[n-1] work. zt holds the
// vectors as rows (row k is vector k), so each rotation runs over contiguous memory; null for
// values only. The symmetric test is |e| + dd == dd, the Hermitian one |e| <= eps dd.
Status Tqli(double* d, double* e, int32_t n, double* zt, bool hermitian) {
    e[n - 1] = 0;
    for (int32_t l = 0; l < n; ++l) {
        int32_t iter = 0, m;
        do {
            for (m = l; m < n - 1; ++m) {
                const double dd = std::fabs(d[m]) + std::fabs(d[m + 1]);
                if (hermitian ? std::fabs(e[m]) <= kEps * dd : std::fabs(e[m]) + dd == dd) break;
            }
            if (m == l) break;
            if (iter++ == 30) return NoConvergenceErr;
            double g = (d[l + 1] - d[l]) / (2.0 * e[l]);
            double r = std::hypot(g, 1.0);
            g = d[m] - d[l] + e[l] / (g + std::copysign(r, g));
            double s = 1, c = 1, p = 0;
            int32_t i;
            for (i = m - 1; i >= l; --i) {
                double f = s * e[i];
                const double b = c * e[i];
                e[i + 1] = (r = std::hypot(f, g));
                if (r == 0) {
                    d[i + 1] -= p;
                    e[m] = 0;
                    break;
                }
                s = f / r;
                c = g / r;
                g = d[i + 1] - p;
                r = (d[i] - g) * s + 2.0 * c * b;
                d[i + 1] = g + (p = s * r);
                g = c * r - b;
                if (zt != nullptr) {
                    double* u = zt + Ix(i, 0, n);
                    double* w = zt + Ix(i + 1, 0, n);
                    for (int32_t k = 0; k < n; ++k) {
                        f = w[k];
                        w[k] = s * u[k] + c * f;
                        u[k] = c * u[k] - s * f;
                    }
                }
            }
            if (r == 0 && i >= l) continue;
            d[l] -= p;
            e[l] = g;
            e[m] = 0;
        } while (m != l);
    }
    return 0;
}

// Rows of vt scaled to unit 2-norm where the squared norm is above 0.
template <class T>
void UnitRows(T* vt, int32_t n) {
    for (int32_t j = 0; j < n; ++j) {
        T* v = vt + Ix(j, 0, n);
        double s = 0;
        for (int32_t k = 0; k < n; ++k) s += Abs2(v[k]);
        if (s > 0) {
            const double f = 1.0 / std::sqrt(s);
            for (int32_t k = 0; k < n; ++k) v[k] *= f;
        }
    }
}

// Selection sort ascending; each exchange also exchanges the rows of vt (null: none).
template <class T>
void SortAscending(double* d, int32_t n, T* vt) {
    for (int32_t i = 0; i < n - 1; ++i) {
        int32_t k = i;
        for (int32_t j = i + 1; j < n; ++j)
            if (d[j] < d[k]) k = j;
        if (k == i) continue;
        std::swap(d[i], d[k]);
        if (vt != nullptr) std::swap_ranges(vt + Ix(i, 0, n), vt + Ix(i + 1, 0, n), vt + Ix(k, 0, n));
    }
}

// Reduces w to upper Hessenberg form by Householder reflections, w = Q H Q^H; q (or null) is
// multiplied by Q from the right. work holds 2n elements.
void HouseholderHessenberg(cdouble* w, int32_t n, cdouble* q, cdouble* work) {
    const auto W = [&](int32_t i, int32_t j) -> cdouble& { return w[Ix(i, j, n)]; };
    for (int32_t k = 0; k + 2 < n; ++k) {
        double big = 0, tail = 0;
        for (int32_t i = k + 1; i < n; ++i) big = std::max(big, Magnitude(W(i, k)));
        if (big == 0) continue;
        for (int32_t i = k + 2; i < n; ++i) tail += Abs2(W(i, k) / big);
        if (tail == 0) continue;
        const cdouble x0 = W(k + 1, k);
        const double alpha = big * std::sqrt(tail + Abs2(x0 / big));
        const double m0 = Magnitude(x0);
        const cdouble phase = m0 == 0 ? cdouble(1) : x0 / m0;
        // v = x + phase alpha e1, v^H v = 2 alpha (alpha + |x0|).
        cdouble* v = work;
        v[k + 1] = x0 + phase * alpha;
        for (int32_t i = k + 2; i < n; ++i) v[i] = W(i, k);
        const double tau = 1.0 / (alpha * (alpha + m0));
        // Left: rows k+1.. of columns k+1..; column k becomes -phase alpha e1.
        cdouble* s = work + n;
        std::fill(s, s + n, cdouble(0));
        for (int32_t i = k + 1; i < n; ++i) {
            const cdouble vi = std::conj(v[i]);
            for (int32_t j = k + 1; j < n; ++j) s[j] += vi * W(i, j);
        }
        for (int32_t i = k + 1; i < n; ++i) {
            const cdouble tv = tau * v[i];
            for (int32_t j = k + 1; j < n; ++j) W(i, j) -= tv * s[j];
        }
        W(k + 1, k) = -phase * alpha;
        for (int32_t i = k + 2; i < n; ++i) W(i, k) = 0;
        // Right: all rows, columns k+1..
        const auto right = [&](cdouble* m) {
            for (int32_t i = 0; i < n; ++i) {
                cdouble* row = m + Ix(i, 0, n);
                cdouble t = 0;
                for (int32_t j = k + 1; j < n; ++j) t += row[j] * v[j];
                t *= tau;
                for (int32_t j = k + 1; j < n; ++j) row[j] -= t * std::conj(v[j]);
            }
        };
        right(w);
        if (q != nullptr) right(q);
    }
}

void Identity(cdouble* q, int32_t n) {
    std::fill(q, q + Square(n), cdouble(0));
    for (int32_t i = 0; i < n; ++i) q[Ix(i, i, n)] = 1;
}

// Lower triangle of a as a full Hermitian matrix (the diagonal's imaginary part dropped).
void HermitianFull(const cdouble* a, int32_t n, cdouble* w) {
    for (int32_t i = 0; i < n; ++i) {
        for (int32_t j = 0; j < i; ++j) {
            w[Ix(i, j, n)] = a[Ix(i, j, n)];
            w[Ix(j, i, n)] = std::conj(a[Ix(i, j, n)]);
        }
        w[Ix(i, i, n)] = a[Ix(i, i, n)].real();
    }
}

int32_t ScreenLower(const double* a, int32_t n) {
    for (int32_t i = 0; i < n; ++i)
        if (HasNonFinite(a + Ix(i, 0, n), i + 1)) return 1;
    return 0;
}
int32_t ScreenLower(const cdouble* a, int32_t n) {
    for (int32_t i = 0; i < n; ++i)
        if (CxHasNonFinite(a + Ix(i, 0, n), i + 1)) return 1;
    return 0;
}

}  // namespace

Status SymmetricEigen(const double* a, int32_t n, int32_t output, double* values, double* vectors) {
    if (n < 1) return EmptyArrayErr;
    if (ScreenLower(a, n)) return NanInfErr;
    const bool wantV = output != 0 && vectors != nullptr;
    Scratch<double> work;
    if (work.Allocate(Square(n) + static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* z = wantV ? vectors : work.get();
    double* zt = wantV ? work.get() : nullptr;
    double* e = work.get() + Square(n);
    if (z != a)
        for (int32_t i = 0; i < n; ++i) std::memcpy(z + Ix(i, 0, n), a + Ix(i, 0, n), static_cast<size_t>(i + 1) * sizeof(double));
    Tred2(z, n, wantV, values, e);
    for (int32_t i = 1; i < n; ++i) e[i - 1] = e[i];
    if (wantV)
        for (int32_t i = 0; i < n; ++i)
            for (int32_t j = 0; j < n; ++j) zt[Ix(j, i, n)] = z[Ix(i, j, n)];
    Status s = Tqli(values, e, n, zt, false);
    if (s == 0 && wantV) {
        UnitRows(zt, n);
        SortAscending(values, n, zt);
        for (int32_t i = 0; i < n; ++i)
            for (int32_t j = 0; j < n; ++j) vectors[Ix(i, j, n)] = zt[Ix(j, i, n)];
    } else if (s == 0) {
        SortAscending<double>(values, n, nullptr);
    }
    return MergeRelease(s, work.Release());
}

Status HermitianEigen(const cdouble* a, int32_t n, int32_t output, cdouble* values, cdouble* vectors) {
    if (n < 1) return EmptyArrayErr;
    if (ScreenLower(a, n)) return NanInfErr;
    const bool wantV = output != 0 && vectors != nullptr;
    const size_t nn = Square(n);
    Scratch<cdouble> cwork;
    Scratch<double> rwork;
    if (cwork.Allocate(nn * (wantV ? 2 : 1) + 2 * static_cast<size_t>(n)) != 0 ||
        rwork.Allocate(static_cast<size_t>(2 * n) + (wantV ? nn : 0)) != 0)
        return OutOfMemoryErr;
    cdouble* w = cwork.get();
    cdouble* q = wantV ? w + nn : nullptr;
    cdouble* hv = w + nn * (wantV ? 2 : 1);
    double* d = rwork.get();
    double* e = d + n;
    double* zt = wantV ? e + n : nullptr;
    HermitianFull(a, n, w);
    if (q != nullptr) Identity(q, n);
    HouseholderHessenberg(w, n, q, hv);
    // The off-diagonal made real by a diagonal unitary scaling, which goes into the columns of Q.
    cdouble phase = 1;
    for (int32_t k = 0; k < n; ++k) {
        d[k] = w[Ix(k, k, n)].real();
        if (q != nullptr && k > 0)
            for (int32_t i = 0; i < n; ++i) q[Ix(i, k, n)] *= phase;
        if (k + 1 < n) {
            const cdouble sub = w[Ix(k + 1, k, n)];
            const double m = Magnitude(sub);
            e[k] = m;
            if (m != 0) phase *= sub / m;
        }
    }
    if (zt != nullptr) {
        std::fill(zt, zt + nn, 0.0);
        for (int32_t i = 0; i < n; ++i) zt[Ix(i, i, n)] = 1;
    }
    Status s = Tqli(d, e, n, zt, true);
    if (s == 0) {
        SortAscending(d, n, zt);
        for (int32_t i = 0; i < n; ++i) values[i] = d[i];
    }
    if (s == 0 && wantV) {
        // V = Q Z, column j from row j of zt.
        for (int32_t r = 0; r < n; ++r)
            for (int32_t j = 0; j < n; ++j) {
                cdouble t = 0;
                const double* zj = zt + Ix(j, 0, n);
                const cdouble* qr = q + Ix(r, 0, n);
                for (int32_t k = 0; k < n; ++k) t += qr[k] * zj[k];
                w[Ix(j, r, n)] = t;
            }
        UnitRows(w, n);
        for (int32_t r = 0; r < n; ++r)
            for (int32_t j = 0; j < n; ++j) vectors[Ix(r, j, n)] = w[Ix(j, r, n)];
    }
    return MergeRelease(MergeRelease(s, cwork.Release()), rwork.Release());
}

namespace {

inline double Norm1(double x) { return std::fabs(x); }
inline double Norm1(cdouble z) { return std::fabs(z.real()) + std::fabs(z.imag()); }

// Balancing with radix 2: permutations isolate eigenvalues, then row and column scaling (sums of
// |re| + |im| for complex data). scale[i] holds the exchanged index (0-based) outside low..igh,
// the factor inside.
template <class T>
void Balanc(T* a, int32_t n, int32_t* low, int32_t* igh, double* scale) {
    const auto A = [&](int32_t i, int32_t j) -> T& { return a[Ix(i, j, n)]; };
    constexpr double radix = 2, b2 = radix * radix;
    int32_t k = 0, l = n - 1;
    const auto exchange = [&](int32_t j, int32_t m) {
        scale[m] = j;
        if (j == m) return;
        for (int32_t i = 0; i <= l; ++i) std::swap(A(i, j), A(i, m));
        for (int32_t i = k; i < n; ++i) std::swap(A(j, i), A(m, i));
    };
    // Rows isolating an eigenvalue go to the bottom.
    for (bool found = true; found && l >= 0;) {
        found = false;
        for (int32_t j = l; j >= 0; --j) {
            bool isolated = true;
            for (int32_t i = 0; i <= l && isolated; ++i)
                if (i != j && A(j, i) != T(0)) isolated = false;
            if (!isolated) continue;
            exchange(j, l);
            if (l == 0) {
                // All isolated: the one left is unscaled.
                scale[0] = 1;
                *low = *igh = 0;
                return;
            }
            --l;
            found = true;
            break;
        }
    }
    // Columns isolating an eigenvalue go to the left.
    for (bool found = true; found;) {
        found = false;
        for (int32_t j = k; j <= l; ++j) {
            bool isolated = true;
            for (int32_t i = k; i <= l && isolated; ++i)
                if (i != j && A(i, j) != T(0)) isolated = false;
            if (!isolated) continue;
            exchange(j, k);
            ++k;
            found = true;
            break;
        }
    }
    for (int32_t i = k; i <= l; ++i) scale[i] = 1;
    // Subnormal entries can make the scalings cycle; a hundred passes is far beyond what any
    // matrix of normal numbers needs.
    for (int32_t pass = 0, noconv = 1; noconv && pass < 100; ++pass) {
        noconv = 0;
        for (int32_t i = k; i <= l; ++i) {
            double c = 0, r = 0;
            for (int32_t j = k; j <= l; ++j) {
                if (j == i) continue;
                c += Norm1(A(j, i));
                r += Norm1(A(i, j));
            }
            // Sums that overflowed would keep the radix loops from ending.
            if (c == 0 || r == 0 || !std::isfinite(c + r)) continue;
            double g = r / radix, f = 1;
            const double s = c + r;
            // The factors stay within the normal range, as subnormal or overflowing entries would
            // otherwise drive them (and the passes) on for a very long time.
            while (c < g && f < 0x1p500 && c < 0x1p1000) {
                f *= radix;
                c *= b2;
            }
            g = r * radix;
            while (c >= g && f > 0x1p-500 && c > 0x1p-1000) {
                f /= radix;
                c /= b2;
            }
            if ((c + r) / f >= 0.95 * s) continue;
            g = 1 / f;
            scale[i] *= f;
            noconv = 1;
            for (int32_t j = k; j < n; ++j) A(i, j) *= g;
            for (int32_t j = 0; j <= l; ++j) A(j, i) *= f;
        }
    }
    *low = k;
    *igh = l;
}

// Stabilised elimination to Hessenberg form over rows and columns low..igh; perm[m] is the row
// exchanged with m, the multipliers stay below the subdiagonal.
void Elmhes(double* a, int32_t n, int32_t low, int32_t igh, int32_t* perm) {
    const auto A = [&](int32_t i, int32_t j) -> double& { return a[Ix(i, j, n)]; };
    for (int32_t m = low + 1; m < igh; ++m) {
        double x = 0;
        int32_t i = m;
        for (int32_t j = m; j <= igh; ++j)
            if (std::fabs(A(j, m - 1)) > std::fabs(x)) {
                x = A(j, m - 1);
                i = j;
            }
        perm[m] = i;
        if (i != m) {
            for (int32_t j = m - 1; j < n; ++j) std::swap(A(i, j), A(m, j));
            for (int32_t j = 0; j <= igh; ++j) std::swap(A(j, i), A(j, m));
        }
        if (x == 0) continue;
        for (i = m + 1; i <= igh; ++i) {
            double y = A(i, m - 1);
            if (y == 0) continue;
            y /= x;
            A(i, m - 1) = y;
            for (int32_t j = m; j < n; ++j) A(i, j) -= y * A(m, j);
            for (int32_t j = 0; j <= igh; ++j) A(j, m) += y * A(j, i);
        }
    }
}

// The accumulated transformation of Elmhes.
void Eltran(const double* a, int32_t n, int32_t low, int32_t igh, const int32_t* perm, double* z) {
    std::fill(z, z + Square(n), 0.0);
    for (int32_t i = 0; i < n; ++i) z[Ix(i, i, n)] = 1;
    for (int32_t mp = igh - 1; mp > low; --mp) {
        for (int32_t i = mp + 1; i <= igh; ++i) z[Ix(i, mp, n)] = a[Ix(i, mp - 1, n)];
        const int32_t i = perm[mp];
        if (i == mp) continue;
        for (int32_t j = mp; j <= igh; ++j) {
            z[Ix(mp, j, n)] = z[Ix(i, j, n)];
            z[Ix(i, j, n)] = 0;
        }
        z[Ix(i, mp, n)] = 1;
    }
}

inline void Cdiv(double ar, double ai, double br, double bi, double* cr, double* ci) {
    const cdouble c = Divide(cdouble(ar, ai), cdouble(br, bi));
    *cr = c.real();
    *ci = c.imag();
}

// Double-shift QR on the Hessenberg h; with z (from Eltran) the vectors of the quasi-triangular
// form are found by back substitution and multiplied into z. Without z only the active block is
// transformed.
Status Hqr2(double* h, int32_t n, int32_t low, int32_t igh, double* wr, double* wi, double* z) {
    const bool vec = z != nullptr;
    const auto H = [&](int32_t i, int32_t j) -> double& { return h[Ix(i, j, n)]; };
    const auto Z = [&](int32_t i, int32_t j) -> double& { return z[Ix(i, j, n)]; };
    double norm = 0, p = 0, q = 0, r = 0, s = 0, t = 0, w = 0, x = 0, y = 0, zz = 0;
    for (int32_t i = 0, k = 0; i < n; ++i) {
        for (int32_t j = k; j < n; ++j) norm += std::fabs(H(i, j));
        k = i;
        if (i >= low && i <= igh) continue;
        wr[i] = H(i, i);
        wi[i] = 0;
    }
    int32_t en = igh;
    while (en >= low) {
        int32_t its = 0;
        const int32_t na = en - 1, enm2 = na - 1;
        for (;;) {
            int32_t l;
            for (l = en; l > low; --l) {
                s = std::fabs(H(l - 1, l - 1)) + std::fabs(H(l, l));
                if (s == 0) s = norm;
                if (std::fabs(H(l, l - 1)) <= kEps * s) break;
            }
            x = H(en, en);
            if (l == en) {
                // One root.
                H(en, en) = x + t;
                wr[en] = H(en, en);
                wi[en] = 0;
                en = na;
                break;
            }
            y = H(na, na);
            w = H(en, na) * H(na, en);
            if (l == na) {
                // Two roots.
                p = (y - x) / 2.0;
                q = p * p + w;
                zz = std::sqrt(std::fabs(q));
                H(en, en) = x + t;
                x = H(en, en);
                H(na, na) = y + t;
                if (q >= 0) {
                    zz = p + std::copysign(zz, p);
                    wr[na] = x + zz;
                    wr[en] = wr[na];
                    if (zz != 0) wr[en] = x - w / zz;
                    wi[na] = 0;
                    wi[en] = 0;
                    if (vec) {
                        x = H(en, na);
                        s = std::fabs(x) + std::fabs(zz);
                        p = x / s;
                        q = zz / s;
                        r = std::sqrt(p * p + q * q);
                        p /= r;
                        q /= r;
                        for (int32_t j = na; j < n; ++j) {
                            zz = H(na, j);
                            H(na, j) = q * zz + p * H(en, j);
                            H(en, j) = q * H(en, j) - p * zz;
                        }
                        for (int32_t i = 0; i <= en; ++i) {
                            zz = H(i, na);
                            H(i, na) = q * zz + p * H(i, en);
                            H(i, en) = q * H(i, en) - p * zz;
                        }
                        for (int32_t i = low; i <= igh; ++i) {
                            zz = Z(i, na);
                            Z(i, na) = q * zz + p * Z(i, en);
                            Z(i, en) = q * Z(i, en) - p * zz;
                        }
                    }
                } else {
                    wr[na] = x + p;
                    wr[en] = x + p;
                    wi[na] = zz;
                    wi[en] = -zz;
                }
                en = enm2;
                break;
            }
            if (its == 40) return NoConvergenceErr;
            if (its == 10 || its == 20 || its == 30) {
                // Exceptional shift.
                t += x;
                for (int32_t i = low; i <= en; ++i) H(i, i) -= x;
                s = std::fabs(H(en, na)) + std::fabs(H(na, enm2));
                x = y = 0.75 * s;
                w = -0.4375 * s * s;
            }
            ++its;
            // Two consecutive small subdiagonal elements.
            int32_t m;
            for (m = enm2; m >= l; --m) {
                zz = H(m, m);
                r = x - zz;
                s = y - zz;
                p = (r * s - w) / H(m + 1, m) + H(m, m + 1);
                q = H(m + 1, m + 1) - zz - r - s;
                r = H(m + 2, m + 1);
                s = std::fabs(p) + std::fabs(q) + std::fabs(r);
                p /= s;
                q /= s;
                r /= s;
                if (m == l) break;
                if (std::fabs(H(m, m - 1)) * (std::fabs(q) + std::fabs(r)) <=
                    kEps * std::fabs(p) * (std::fabs(H(m - 1, m - 1)) + std::fabs(zz) + std::fabs(H(m + 1, m + 1))))
                    break;
            }
            for (int32_t i = m + 2; i <= en; ++i) {
                H(i, i - 2) = 0;
                if (i != m + 2) H(i, i - 3) = 0;
            }
            const int32_t jEnd = vec ? n - 1 : en, iStart = vec ? 0 : l;
            for (int32_t k = m; k <= na; ++k) {
                const bool notlas = k != na;
                if (k != m) {
                    p = H(k, k - 1);
                    q = H(k + 1, k - 1);
                    r = notlas ? H(k + 2, k - 1) : 0;
                    x = std::fabs(p) + std::fabs(q) + std::fabs(r);
                    if (x == 0) continue;
                    p /= x;
                    q /= x;
                    r /= x;
                }
                s = std::copysign(std::sqrt(p * p + q * q + r * r), p);
                if (k != m)
                    H(k, k - 1) = -s * x;
                else if (l != m)
                    H(k, k - 1) = -H(k, k - 1);
                p += s;
                x = p / s;
                y = q / s;
                zz = r / s;
                q /= p;
                r /= p;
                const int32_t iEnd = std::min(en, k + 3);
                if (!notlas) {
                    for (int32_t j = k; j <= jEnd; ++j) {
                        p = H(k, j) + q * H(k + 1, j);
                        H(k, j) -= p * x;
                        H(k + 1, j) -= p * y;
                    }
                    for (int32_t i = iStart; i <= iEnd; ++i) {
                        p = x * H(i, k) + y * H(i, k + 1);
                        H(i, k) -= p;
                        H(i, k + 1) -= p * q;
                    }
                    if (vec)
                        for (int32_t i = low; i <= igh; ++i) {
                            p = x * Z(i, k) + y * Z(i, k + 1);
                            Z(i, k) -= p;
                            Z(i, k + 1) -= p * q;
                        }
                } else {
                    for (int32_t j = k; j <= jEnd; ++j) {
                        p = H(k, j) + q * H(k + 1, j) + r * H(k + 2, j);
                        H(k, j) -= p * x;
                        H(k + 1, j) -= p * y;
                        H(k + 2, j) -= p * zz;
                    }
                    for (int32_t i = iStart; i <= iEnd; ++i) {
                        p = x * H(i, k) + y * H(i, k + 1) + zz * H(i, k + 2);
                        H(i, k) -= p;
                        H(i, k + 1) -= p * q;
                        H(i, k + 2) -= p * r;
                    }
                    if (vec)
                        for (int32_t i = low; i <= igh; ++i) {
                            p = x * Z(i, k) + y * Z(i, k + 1) + zz * Z(i, k + 2);
                            Z(i, k) -= p;
                            Z(i, k + 1) -= p * q;
                            Z(i, k + 2) -= p * r;
                        }
                }
            }
        }
    }
    if (!vec || norm == 0) return 0;
    // Back substitution on the quasi-triangular form.
    for (int32_t en2 = n - 1; en2 >= 0; --en2) {
        p = wr[en2];
        q = wi[en2];
        const int32_t na = en2 - 1;
        if (q == 0) {
            int32_t m = en2;
            H(en2, en2) = 1;
            for (int32_t i = na; i >= 0; --i) {
                w = H(i, i) - p;
                r = 0;
                for (int32_t j = m; j <= en2; ++j) r += H(i, j) * H(j, en2);
                if (wi[i] < 0) {
                    zz = w;
                    s = r;
                    continue;
                }
                m = i;
                if (wi[i] == 0) {
                    t = w != 0 ? w : kEps * norm;
                    H(i, en2) = -r / t;
                } else {
                    x = H(i, i + 1);
                    y = H(i + 1, i);
                    q = (wr[i] - p) * (wr[i] - p) + wi[i] * wi[i];
                    t = (x * s - zz * r) / q;
                    H(i, en2) = t;
                    H(i + 1, en2) = std::fabs(x) > std::fabs(zz) ? (-r - w * t) / x : (-s - y * t) / zz;
                }
            }
        } else if (q < 0) {
            int32_t m = na;
            // The last component chosen imaginary so that the vector matrix is triangular.
            if (std::fabs(H(en2, na)) > std::fabs(H(na, en2))) {
                H(na, na) = q / H(en2, na);
                H(na, en2) = -(H(en2, en2) - p) / H(en2, na);
            } else {
                Cdiv(0.0, -H(na, en2), H(na, na) - p, q, &H(na, na), &H(na, en2));
            }
            H(en2, na) = 0;
            H(en2, en2) = 1;
            for (int32_t i = na - 1; i >= 0; --i) {
                w = H(i, i) - p;
                double ra = 0, sa = 0;
                for (int32_t j = m; j <= en2; ++j) {
                    ra += H(i, j) * H(j, na);
                    sa += H(i, j) * H(j, en2);
                }
                if (wi[i] < 0) {
                    zz = w;
                    r = ra;
                    s = sa;
                    continue;
                }
                m = i;
                if (wi[i] == 0) {
                    Cdiv(-ra, -sa, w, q, &H(i, na), &H(i, en2));
                } else {
                    x = H(i, i + 1);
                    y = H(i + 1, i);
                    double vr = (wr[i] - p) * (wr[i] - p) + wi[i] * wi[i] - q * q;
                    const double vi = (wr[i] - p) * 2.0 * q;
                    if (vr == 0 && vi == 0)
                        vr = kEps * norm * (std::fabs(w) + std::fabs(q) + std::fabs(x) + std::fabs(y) + std::fabs(zz));
                    Cdiv(x * r - zz * ra + q * sa, x * s - zz * sa - q * ra, vr, vi, &H(i, na), &H(i, en2));
                    if (std::fabs(x) > std::fabs(zz) + std::fabs(q)) {
                        H(i + 1, na) = (-ra - w * H(i, na) + q * H(i, en2)) / x;
                        H(i + 1, en2) = (-sa - w * H(i, en2) - q * H(i, na)) / x;
                    } else {
                        Cdiv(-r - y * H(i, na), -s - y * H(i, en2), zz, q, &H(i + 1, na), &H(i + 1, en2));
                    }
                }
            }
        }
    }
    // Vectors of isolated roots, then the product with the transformation.
    for (int32_t i = 0; i < n; ++i) {
        if (i >= low && i <= igh) continue;
        for (int32_t j = i; j < n; ++j) Z(i, j) = H(i, j);
    }
    for (int32_t j = n - 1; j >= low; --j) {
        const int32_t m = std::min(j, igh);
        for (int32_t i = low; i <= igh; ++i) {
            zz = 0;
            for (int32_t k = low; k <= m; ++k) zz += Z(i, k) * H(k, j);
            Z(i, j) = zz;
        }
    }
    return 0;
}

// Undoes the scaling and the permutations of Balanc on the rows of z.
template <class T>
void Balbak(T* z, int32_t n, int32_t low, int32_t igh, const double* scale) {
    for (int32_t i = low; i <= igh; ++i) {
        const double s = scale[i];
        for (int32_t j = 0; j < n; ++j) z[Ix(i, j, n)] *= s;
    }
    for (int32_t ii = 0; ii < n; ++ii) {
        int32_t i = ii;
        if (i >= low && i <= igh) continue;
        if (i < low) i = low - 1 - ii;
        const auto k = static_cast<int32_t>(scale[i]);
        if (k == i) continue;
        std::swap_ranges(z + Ix(i, 0, n), z + Ix(i + 1, 0, n), z + Ix(k, 0, n));
    }
}

// Unit 2-norm columns, zero columns left alone.
void UnitColumns(cdouble* v, int32_t n) {
    for (int32_t j = 0; j < n; ++j) {
        double s = 0;
        for (int32_t i = 0; i < n; ++i) s += Abs2(v[Ix(i, j, n)]);
        if (s == 0) continue;
        const double f = 1.0 / std::sqrt(s);
        for (int32_t i = 0; i < n; ++i) v[Ix(i, j, n)] *= f;
    }
}

}  // namespace

Status GeneralEigen(const double* a, int32_t n, int32_t output, cdouble* values, cdouble* vectors) {
    if (n < 1) return EmptyArrayErr;
    if (HasNonFinite(a, n * n)) return NanInfErr;
    const bool wantV = output != 0 && vectors != nullptr;
    const size_t nn = Square(n);
    Scratch<double> work;
    Scratch<int32_t> perm;
    if (work.Allocate(nn * (wantV ? 2 : 1) + 3 * static_cast<size_t>(n)) != 0 ||
        perm.Allocate(static_cast<size_t>(n)) != 0)
        return OutOfMemoryErr;
    double* h = work.get();
    double* scale = h + nn;
    double* wr = scale + n;
    double* wi = wr + n;
    double* z = wantV ? wi + n : nullptr;
    std::memcpy(h, a, nn * sizeof(double));
    int32_t low = 0, igh = 0;
    Balanc(h, n, &low, &igh, scale);
    Elmhes(h, n, low, igh, perm.get());
    if (wantV) Eltran(h, n, low, igh, perm.get(), z);
    Status s = Hqr2(h, n, low, igh, wr, wi, z);
    if (s == 0) {
        for (int32_t i = 0; i < n; ++i) values[i] = cdouble(wr[i], wi[i]);
        if (wantV) {
            Balbak(z, n, low, igh, scale);
            for (int32_t j = 0; j < n; ++j) {
                if (wi[j] > 0 && j + 1 < n) {
                    for (int32_t i = 0; i < n; ++i) {
                        const double x = z[Ix(i, j, n)], y = z[Ix(i, j + 1, n)];
                        vectors[Ix(i, j, n)] = cdouble(x, y);
                        vectors[Ix(i, j + 1, n)] = cdouble(x, -y);
                    }
                    ++j;
                } else {
                    for (int32_t i = 0; i < n; ++i) vectors[Ix(i, j, n)] = z[Ix(i, j, n)];
                }
            }
            UnitColumns(vectors, n);
        }
    }
    return MergeRelease(MergeRelease(s, work.Release()), perm.Release());
}

namespace {

// Single-shift complex QR on the Hessenberg h, in plane rotations. With z the full triangular
// form is kept and the transformations are accumulated into z.
Status Comqr(cdouble* h, int32_t n, cdouble* z) {
    const bool vec = z != nullptr;
    const auto H = [&](int32_t i, int32_t j) -> cdouble& { return h[Ix(i, j, n)]; };
    Scratch<cdouble> rot;
    if (rot.Allocate(2 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    cdouble* cs = rot.get();
    int32_t en = n - 1, its = 0;
    while (en >= 0) {
        int32_t l;
        for (l = en; l > 0; --l) {
            const double tst = Norm1(H(l - 1, l - 1)) + Norm1(H(l, l));
            if (Norm1(H(l, l - 1)) <= kEps * tst) break;
        }
        if (l == en) {
            if (en > 0) H(en, en - 1) = 0;
            --en;
            its = 0;
            continue;
        }
        if (l > 0) H(l, l - 1) = 0;
        if (its == 30) return MergeRelease(NoConvergenceErr, rot.Release());
        cdouble shift;
        if (its == 10 || its == 20) {
            shift = std::fabs(H(en, en - 1).real()) + (en - 2 >= l ? std::fabs(H(en - 1, en - 2).real()) : 0.0);
        } else {
            shift = H(en, en);
            const cdouble x = H(en - 1, en) * H(en, en - 1);
            if (x != 0.0) {
                const cdouble y = (H(en - 1, en - 1) - shift) / 2.0;
                cdouble zr = std::sqrt(y * y + x);
                if (y.real() * zr.real() + y.imag() * zr.imag() < 0) zr = -zr;
                shift -= Divide(x, y + zr);
            }
        }
        ++its;
        for (int32_t i = l; i <= en; ++i) H(i, i) -= shift;
        const int32_t jEnd = vec ? n - 1 : en, iStart = vec ? 0 : l;
        // R = G (H - s I): rotations from the top.
        for (int32_t k = l; k < en; ++k) {
            const cdouble a = H(k, k), b = H(k + 1, k);
            const double r = std::hypot(std::abs(a), std::abs(b));
            cdouble c = 1, s = 0;
            if (r != 0) {
                c = a / r;
                s = b / r;
            }
            cs[2 * k] = c;
            cs[2 * k + 1] = s;
            for (int32_t j = k; j <= jEnd; ++j) {
                const cdouble u = H(k, j), w = H(k + 1, j);
                H(k, j) = std::conj(c) * u + std::conj(s) * w;
                H(k + 1, j) = c * w - s * u;
            }
            H(k + 1, k) = 0;
        }
        // R G^H, and the same on the columns of z.
        const auto columns = [&](cdouble* m, int32_t k, int32_t i0, int32_t i1) {
            const cdouble c = cs[2 * k], s = cs[2 * k + 1];
            for (int32_t i = i0; i <= i1; ++i) {
                cdouble* row = m + Ix(i, 0, n);
                const cdouble u = row[k], w = row[k + 1];
                row[k] = c * u + s * w;
                row[k + 1] = std::conj(c) * w - std::conj(s) * u;
            }
        };
        for (int32_t k = l; k < en; ++k) {
            columns(h, k, iStart, std::min(k + 1, en));
            if (vec) columns(z, k, 0, n - 1);
        }
        for (int32_t i = l; i <= en; ++i) H(i, i) += shift;
    }
    return rot.Release();
}

}  // namespace

Status CxGeneralEigen(const cdouble* a, int32_t n, int32_t output, cdouble* values, cdouble* vectors) {
    if (n < 1) return EmptyArrayErr;
    if (CxHasNonFinite(a, n * n)) return NanInfErr;
    const bool wantV = output != 0 && vectors != nullptr;
    const size_t nn = Square(n);
    Scratch<cdouble> work;
    if (work.Allocate(nn * (wantV ? 3 : 1) + 2 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    Scratch<double> scaleBlock;
    if (scaleBlock.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* scale = scaleBlock.get();
    cdouble* h = work.get();
    cdouble* hv = h + nn;
    cdouble* z = wantV ? hv + 2 * n : nullptr;
    cdouble* y = wantV ? z + nn : nullptr;
    std::memcpy(static_cast<void*>(h), a, nn * sizeof(cdouble));
    int32_t low = 0, igh = 0;
    Balanc(h, n, &low, &igh, scale);
    if (z != nullptr) Identity(z, n);
    HouseholderHessenberg(h, n, z, hv);
    Status s = Comqr(h, n, z);
    if (s == 0)
        for (int32_t i = 0; i < n; ++i) values[i] = h[Ix(i, i, n)];
    if (s == 0 && wantV) {
        double norm = 0;
        for (int32_t i = 0; i < n; ++i)
            for (int32_t j = i; j < n; ++j) norm += Norm1(h[Ix(i, j, n)]);
        // Vectors of the triangular form by back substitution, eps norm for a zero denominator;
        // y holds them as rows.
        std::fill(y, y + nn, cdouble(0));
        for (int32_t k = n - 1; k >= 0; --k) {
            cdouble* v = y + Ix(k, 0, n);
            const cdouble lambda = h[Ix(k, k, n)];
            v[k] = 1;
            for (int32_t i = k - 1; i >= 0; --i) {
                cdouble r = 0;
                for (int32_t j = i + 1; j <= k; ++j) r += h[Ix(i, j, n)] * v[j];
                cdouble d = h[Ix(i, i, n)] - lambda;
                if (d == 0.0) d = kEps * norm;
                v[i] = Divide(-r, d);
            }
        }
        for (int32_t r = 0; r < n; ++r) {
            const cdouble* zr = z + Ix(r, 0, n);
            for (int32_t k = 0; k < n; ++k) {
                const cdouble* v = y + Ix(k, 0, n);
                cdouble t = 0;
                for (int32_t j = 0; j <= k; ++j) t += zr[j] * v[j];
                vectors[Ix(r, k, n)] = t;
            }
        }
        Balbak(vectors, n, low, igh, scale);
        UnitColumns(vectors, n);
    }
    return MergeRelease(MergeRelease(s, work.Release()), scaleBlock.Release());
}

int32_t PolyFromRoots(const cdouble* r, int32_t n, cdouble* c) {
    // Each product trims a trailing run of coefficients of modulus at most 1e-8 from its
    // operands; with operands low power first the run sits at the monic end and never shortens
    // the product, so a zero root stays a root.
    const auto trimmed = [](const cdouble* p, int32_t len) {
        while (len > 0 && std::abs(p[len - 1]) <= 1e-8) --len;
        return len;
    };
    int32_t len = 1;
    c[0] = 1;
    for (int32_t i = 0; i < n; ++i) {
        const cdouble factor[2] = {-r[i], 1.0};
        const int32_t la = trimmed(c, len), lb = trimmed(factor, 2);
        const int32_t out = (la == 0 || lb == 0) ? 0 : la + lb - 1;
        // Plain convolution in place, from the top down.
        for (int32_t k = out - 1; k >= 0; --k) {
            cdouble t = 0;
            for (int32_t j = 0; j < lb; ++j)
                if (k - j >= 0 && k - j < la) t += c[k - j] * factor[j];
            c[k] = t;
        }
        len = out;
    }
    for (int32_t k = len; k <= n; ++k) c[k] = 0;
    return len - 1;
}

}  // namespace tw
