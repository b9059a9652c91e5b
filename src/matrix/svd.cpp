// Golub-Reinsch SVD: Householder bidiagonalisation, accumulation of both transformations, and
// implicit QR with shift on the bidiagonal form. The complex form reduces to a complex bidiagonal
// matrix, makes it real with unit-modulus scalings, and then runs the real iteration.
#include <algorithm>
#include <cstring>
#include <utility>

#include "frame/frame.hpp"
#include "matrix/decompose.hpp"

namespace tw {

// Sweeps allowed for each singular value.
int32_t g_svdSweepLimit = 100;

namespace {

double Hypot(double a, double b) {
    a = std::fabs(a), b = std::fabs(b);
    const double hi = std::max(a, b), lo = std::min(a, b);
    if (hi == 0) return 0;
    const double r = lo / hi;
    return hi * std::sqrt(1 + r * r);
}

// Negligible against anorm: the test compares the difference with eps rather than with 0.
bool Negligible(double x, double anorm) { return (std::fabs(x) + anorm) - anorm < kEps; }

inline double Phase(double x) { return x < 0 ? -1.0 : 1.0; }
inline cdouble Phase(cdouble z) {
    const double r = Magnitude(z);
    return r == 0 ? cdouble(1) : z / r;
}

// Turns x (p elements, stride st) into v with (I - beta v v^H) x = alpha e1, where
// beta = 1 / (|alpha| |v0|), and returns alpha. The elements are scaled by their sum of
// magnitudes while the reflector is formed.
template <class T>
T Householder(T* x, int32_t p, size_t st) {
    double scale = 0;
    for (int32_t k = 0; k < p; ++k) scale += Magnitude(x[k * st]);
    if (scale == 0) return T(0);
    double s = 0;
    for (int32_t k = 0; k < p; ++k) {
        x[k * st] /= scale;
        s += Abs2(x[k * st]);
    }
    const T f = x[0];
    const T g = -Phase(f) * std::sqrt(s);
    x[0] = f - g;
    for (int32_t k = 0; k < p; ++k) x[k * st] *= scale;
    return g * scale;
}

template <class T> double Beta(T alpha, T v0) {
    return alpha == T(0) ? 0.0 : 1 / (Magnitude(alpha) * Magnitude(v0));
}

// a: m by n, m >= n. On return d holds the diagonal and e the superdiagonal (e[i] at (i-1, i),
// e[0] = 0); with vectors, a holds U (m by n) and v holds V (n by n).
template <class T>
void Bidiagonalise(T* a, int32_t m, int32_t n, T* d, T* e, T* v, bool vectors) {
    const auto A = [&](int32_t i, int32_t j) -> T& { return a[static_cast<size_t>(i) * n + j]; };
    e[0] = 0;
    for (int32_t i = 0; i < n; ++i) {
        const int32_t l = i + 1;
        d[i] = Householder(&A(i, i), m - i, static_cast<size_t>(n));
        const double bl = Beta(d[i], A(i, i));
        if (bl != 0)
            for (int32_t j = l; j < n; ++j) {
                T dot = 0;
                for (int32_t k = i; k < m; ++k) dot += Conj(A(k, i)) * A(k, j);
                const T f = dot * bl;
                for (int32_t k = i; k < m; ++k) A(k, j) -= f * A(k, i);
            }
        if (l >= n) continue;
        for (int32_t k = l; k < n; ++k) A(i, k) = Conj(A(i, k));
        const T g = Householder(&A(i, l), n - l, 1);
        e[l] = Conj(g);
        const double br = Beta(g, A(i, l));
        if (br != 0)
            for (int32_t j = l; j < m; ++j) {
                T dot = 0;
                for (int32_t k = l; k < n; ++k) dot += A(j, k) * A(i, k);
                const T f = dot * br;
                for (int32_t k = l; k < n; ++k) A(j, k) -= f * Conj(A(i, k));
            }
    }
    if (!vectors) return;
    const auto V = [&](int32_t i, int32_t j) -> T& { return v[static_cast<size_t>(i) * n + j]; };
    std::fill(v, v + static_cast<size_t>(n) * n, T(0));
    for (int32_t i = 0; i < n; ++i) V(i, i) = 1;
    for (int32_t i = n - 2; i >= 0; --i) {
        const int32_t l = i + 1;
        const double br = Beta(e[l], A(i, l));
        if (br == 0) continue;
        for (int32_t j = l; j < n; ++j) {
            T dot = 0;
            for (int32_t k = l; k < n; ++k) dot += Conj(A(i, k)) * V(k, j);
            const T f = dot * br;
            for (int32_t k = l; k < n; ++k) V(k, j) -= f * A(i, k);
        }
    }
    for (int32_t i = n - 1; i >= 0; --i) {
        const double bl = Beta(d[i], A(i, i));
        for (int32_t j = i + 1; j < n; ++j) {
            T dot = 0;
            for (int32_t k = i; k < m; ++k) dot += Conj(A(k, i)) * A(k, j);
            const T f = dot * bl;
            for (int32_t k = i; k < m; ++k) A(k, j) -= f * A(k, i);
        }
        const T c0 = -bl * Conj(A(i, i));
        for (int32_t k = i + 1; k < m; ++k) A(k, i) *= c0;
        A(i, i) = 1 - bl * Abs2(A(i, i));
        for (int32_t k = 0; k < i; ++k) A(k, i) = 0;
    }
}

// Implicit QR with shift on the real bidiagonal (w, rv1), rotating the columns of u (m by n) and
// v (n by n) along.
template <class T>
Status Diagonalise(double* w, double* rv1, int32_t m, int32_t n, T* u, T* v, bool vectors) {
    const auto rotate = [&](T* x, int32_t rows, int32_t cols, int32_t p, int32_t q, double c, double s) {
        if (!vectors) return;
        for (int32_t r = 0; r < rows; ++r) {
            T* row = x + static_cast<size_t>(r) * cols;
            const T y = row[p], z = row[q];
            row[p] = y * c + z * s;
            row[q] = z * c - y * s;
        }
    };
    double anorm = 0;
    for (int32_t i = 0; i < n; ++i) anorm = std::max(anorm, std::fabs(w[i]) + std::fabs(rv1[i]));
    for (int32_t k = n - 1; k >= 0; --k) {
        for (int32_t its = 0;; ++its) {
            bool split = true;
            int32_t l = k, nm = 0;
            for (; l >= 0; --l) {
                nm = l - 1;
                if (Negligible(rv1[l], anorm)) {
                    split = false;
                    break;
                }
                if (Negligible(w[nm], anorm)) break;
            }
            if (split) {
                // w[nm] is negligible: chase rv1[l] out of the matrix.
                double c = 0, s = 1;
                for (int32_t i = l; i <= k; ++i) {
                    const double f = s * rv1[i];
                    rv1[i] = c * rv1[i];
                    if (Negligible(f, anorm)) break;
                    const double g = w[i];
                    double h = Hypot(f, g);
                    w[i] = h;
                    h = 1 / h;
                    c = g * h;
                    s = -f * h;
                    rotate(u, m, n, nm, i, c, s);
                }
            }
            const double z = w[k];
            if (l == k) {
                if (z < 0) {
                    w[k] = -z;
                    if (vectors)
                        for (int32_t j = 0; j < n; ++j) v[static_cast<size_t>(j) * n + k] = -v[static_cast<size_t>(j) * n + k];
                }
                break;
            }
            if (its == g_svdSweepLimit - 1) return NoConvergenceErr;
            double x = w[l];
            nm = k - 1;
            double y = w[nm], g = rv1[nm], h = rv1[k];
            double f = ((y - z) * (y + z) + (g - h) * (g + h)) / (2 * h * y);
            g = Hypot(f, 1);
            f = ((x - z) * (x + z) + h * ((y / (f + (f >= 0 ? std::fabs(g) : -std::fabs(g)))) - h)) / x;
            double c = 1, s = 1;
            for (int32_t j = l; j <= nm; ++j) {
                const int32_t i = j + 1;
                g = rv1[i];
                y = w[i];
                h = s * g;
                g = c * g;
                double zz = Hypot(f, h);
                rv1[j] = zz;
                c = f / zz;
                s = h / zz;
                f = x * c + g * s;
                g = g * c - x * s;
                h = y * s;
                y *= c;
                rotate(v, n, n, j, i, c, s);
                zz = Hypot(f, h);
                w[j] = zz;
                if (zz != 0) {
                    zz = 1 / zz;
                    c = f * zz;
                    s = h * zz;
                }
                f = c * g + s * y;
                x = c * y - s * g;
                rotate(u, m, n, j, i, c, s);
            }
            rv1[l] = 0;
            rv1[k] = f;
            w[k] = x;
        }
    }
    return 0;
}

// Elements of T beyond the two factors: the real superdiagonal, and for complex data the complex
// diagonal and superdiagonal of the reduction as well.
template <class T> size_t BidiagonalWork(int32_t q) {
    return kIsComplex<T> ? 3 * static_cast<size_t>(q) : static_cast<size_t>(q);
}

template <class T>
Status GolubReinsch(T* a, int32_t m, int32_t n, double* w, T* v, T* extra, bool vectors) {
    double* rv1;
    if constexpr (kIsComplex<T>) {
        T* d = extra;
        T* e = extra + n;
        rv1 = reinterpret_cast<double*>(extra + 2 * static_cast<size_t>(n));
        Bidiagonalise(a, m, n, d, e, v, vectors);
        // Unit-modulus scalings of rows and columns make the bidiagonal form real.
        rv1[0] = 0;
        for (int32_t i = 0; i < n; ++i) {
            const T p = Phase(d[i]);
            w[i] = Magnitude(d[i]);
            if (vectors)
                for (int32_t r = 0; r < m; ++r) a[static_cast<size_t>(r) * n + i] *= p;
            if (i + 1 == n) break;
            e[i + 1] *= Conj(p);
            const T q = Phase(e[i + 1]);
            rv1[i + 1] = Magnitude(e[i + 1]);
            d[i + 1] *= Conj(q);
            if (vectors)
                for (int32_t r = 0; r < n; ++r) v[static_cast<size_t>(r) * n + i + 1] *= Conj(q);
        }
    } else {
        rv1 = extra;
        Bidiagonalise(a, m, n, w, rv1, v, vectors);
    }
    return Diagonalise(w, rv1, m, n, a, v, vectors);
}

}  // namespace

template <class T>
size_t SvdWorkSize(int32_t m, int32_t n) {
    const size_t p = static_cast<size_t>(std::max(m, n)), q = static_cast<size_t>(std::min(m, n));
    return p * q + q * q + BidiagonalWork<T>(static_cast<int32_t>(q));
}

template <class T>
Status ReentrantSvd(const T* a, int32_t m, int32_t n, T* u, double* s, T* v, T* work, size_t* needed) {
    const int32_t r = std::min(m, n);
    if (r < 1) return EmptyArrayErr;
    if (needed != nullptr) *needed = SvdWorkSize<T>(m, n);
    if (work == nullptr) return 0;
    if (Screen(a, m * n)) return NanInfErr;
    const int32_t p = std::max(m, n), q = r;
    T* x = work;
    T* vv = x + static_cast<size_t>(p) * q;
    T* extra = vv + static_cast<size_t>(q) * q;
    // A wide matrix is decomposed as its conjugate transpose, and the factors change roles.
    if (m >= n)
        std::memcpy(x, a, static_cast<size_t>(m) * n * sizeof(T));
    else
        for (int32_t i = 0; i < m; ++i)
            for (int32_t j = 0; j < n; ++j) x[static_cast<size_t>(j) * m + i] = Conj(a[static_cast<size_t>(i) * n + j]);
    const bool vectors = u != nullptr || v != nullptr;
    if (const Status st = GolubReinsch(x, p, q, s, vv, extra, vectors)) return st;
    for (int32_t i = 0; i < q; ++i)
        for (int32_t j = i + 1; j < q; ++j) {
            if (!(s[j] > s[i])) continue;
            std::swap(s[i], s[j]);
            if (!vectors) continue;
            for (int32_t k = 0; k < p; ++k) std::swap(x[static_cast<size_t>(k) * q + i], x[static_cast<size_t>(k) * q + j]);
            for (int32_t k = 0; k < q; ++k) std::swap(vv[static_cast<size_t>(k) * q + i], vv[static_cast<size_t>(k) * q + j]);
        }
    T* left = m >= n ? x : vv;
    T* right = m >= n ? vv : x;
    if (u != nullptr) std::memcpy(u, left, static_cast<size_t>(m) * r * sizeof(T));
    if (v != nullptr) std::memcpy(v, right, static_cast<size_t>(n) * r * sizeof(T));
    return 0;
}

template <class T>
Status FullSvd(const T* a, int32_t m, int32_t n, T* u, double* s, T* v) {
    size_t needed = 0;
    if (const Status st = ReentrantSvd<T>(a, m, n, u, s, v, nullptr, &needed)) return st;
    Scratch<T> work;
    if (work.Allocate(needed) != 0) return OutOfMemoryErr;
    const Status st = ReentrantSvd<T>(a, m, n, u, s, v, work.get(), nullptr);
    return MergeRelease(st, work.Release());
}

template <class T>
Status FullSvd(const T* a, int32_t m, int32_t n, T* u, double* s, T* v, int32_t full) {
    if (full == 0 || m == n) return FullSvd<T>(a, m, n, u, s, v);
    const int32_t r = std::min(m, n), p = std::max(m, n);
    Scratch<T> shortFactor, square, tri;
    if (shortFactor.Allocate(static_cast<size_t>(p) * r) != 0 || square.Allocate(static_cast<size_t>(p) * p) != 0 ||
        tri.Allocate(static_cast<size_t>(p) * r) != 0)
        return OutOfMemoryErr;
    // The factor with p rows is the short one; the other is already square.
    Status st = m > n ? FullSvd<T>(a, m, n, shortFactor.get(), s, v) : FullSvd<T>(a, m, n, u, s, shortFactor.get());
    if (st == 0) st = QrHouseholder<T>(shortFactor.get(), p, r, 0, square.get(), tri.get());
    if (st == 0) {
        // Q's leading columns equal the computed ones up to the phase of R's diagonal.
        T* q = square.get();
        for (int32_t i = 0; i < r; ++i) {
            const T d = tri[static_cast<size_t>(i) * r + i];
            if constexpr (kIsComplex<T>) {
                const T ph = Phase(d);
                for (int32_t k = 0; k < p; ++k) q[static_cast<size_t>(k) * p + i] *= ph;
            } else if (d < 0) {
                for (int32_t k = 0; k < p; ++k) q[static_cast<size_t>(k) * p + i] = -q[static_cast<size_t>(k) * p + i];
            }
        }
        T* out = m > n ? u : v;
        if (out != nullptr) std::memcpy(out, q, static_cast<size_t>(p) * p * sizeof(T));
    }
    return MergeRelease(MergeRelease(MergeRelease(st, shortFactor.Release()), square.Release()), tri.Release());
}

#define TW_SVD(T)                                                                                \
    template size_t SvdWorkSize<T>(int32_t, int32_t);                                            \
    template Status ReentrantSvd<T>(const T*, int32_t, int32_t, T*, double*, T*, T*, size_t*);   \
    template Status FullSvd<T>(const T*, int32_t, int32_t, T*, double*, T*);                    \
    template Status FullSvd<T>(const T*, int32_t, int32_t, T*, double*, T*, int32_t);
TW_SVD(double)
TW_SVD(cdouble)
#undef TW_SVD

}  // namespace tw
