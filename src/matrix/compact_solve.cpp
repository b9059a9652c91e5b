// Cholesky factorisation, substitution and inversion on compact storage. All loops run down the
// stored columns, so that the inner loops read contiguous memory.
#include <algorithm>
#include <cstring>

#include "frame/frame.hpp"
#include "matrix/solve.hpp"

namespace tw {

namespace {

inline double Re(double x) { return x; }
inline double Re(cdouble z) { return z.real(); }

// The left-looking loop. Strict: a diagonal not above 0 ends the loop, and the real form applies
// the sqrt(eps) test. Otherwise a non-positive diagonal is reported and its square root taken
// anyway, so that NaN spreads where the matrix is not positive definite.
template <class T, bool Strict>
Status FactorLoop(T* l, int32_t n) {
    constexpr double kSqrtEps = 1.4901161193847656e-08;  // sqrt(2^-52)
    Status status = 0;
    double largest = 0;
    for (int32_t j = 0; j < n; ++j) {
        T* col = l + LowerAt(n, j, j);
        for (int32_t k = 0; k < j; ++k) {
            const T* prior = l + LowerAt(n, j, k);  // row j onwards of column k
            const T ljk = Conj(prior[0]);
            for (int32_t i = 0; i < n - j; ++i) col[i] -= prior[i] * ljk;
        }
        // NaN is not above 0 either.
        const double d = Re(col[0]);
        if (!(d > 0)) {
            if (Strict) return NotPositiveDefiniteErr;
            status = NotPositiveDefiniteErr;
        }
        const double root = std::sqrt(d);
        col[0] = root;
        for (int32_t i = 1; i < n - j; ++i) col[i] = Divide(col[i], T(root));
        if constexpr (Strict && !kIsComplex<T>) {
            for (int32_t i = 0; i < n - j; ++i) largest = std::max(largest, Magnitude(col[i]));
            for (int32_t k = 0; k <= j; ++k)
                if (l[LowerAt(n, k, k)] < kSqrtEps * largest) status = NotPositiveDefiniteErr;
        }
    }
    return status;
}

// x of L x = b in place, b n by k row-major.
template <class T>
void LowerSolve(const T* l, int32_t n, T* b, int32_t k) {
    for (int32_t j = 0; j < n; ++j) {
        const T* col = l + LowerAt(n, j, j);
        T* bj = b + static_cast<size_t>(j) * k;
        for (int32_t c = 0; c < k; ++c) bj[c] = Divide(bj[c], col[0]);
        for (int32_t i = j + 1; i < n; ++i) {
            T* bi = b + static_cast<size_t>(i) * k;
            const T f = col[i - j];
            for (int32_t c = 0; c < k; ++c) bi[c] -= f * bj[c];
        }
    }
}

// x of L^H x = b in place.
template <class T>
void LowerConjSolve(const T* l, int32_t n, T* b, int32_t k) {
    for (int32_t i = n - 1; i >= 0; --i) {
        const T* col = l + LowerAt(n, i, i);
        T* bi = b + static_cast<size_t>(i) * k;
        for (int32_t r = i + 1; r < n; ++r) {
            const T f = Conj(col[r - i]);
            const T* br = b + static_cast<size_t>(r) * k;
            for (int32_t c = 0; c < k; ++c) bi[c] -= f * br[c];
        }
        for (int32_t c = 0; c < k; ++c) bi[c] = Divide(bi[c], Conj(col[0]));
    }
}

// x of U x = b in place, U in the upper layout.
template <class T>
void UpperSolve(const T* u, int32_t n, T* b, int32_t k) {
    for (int32_t j = n - 1; j >= 0; --j) {
        const T* col = u + UpperAt(0, j);
        T* bj = b + static_cast<size_t>(j) * k;
        for (int32_t c = 0; c < k; ++c) bj[c] = Divide(bj[c], col[j]);
        for (int32_t i = 0; i < j; ++i) {
            T* bi = b + static_cast<size_t>(i) * k;
            const T f = col[i];
            for (int32_t c = 0; c < k; ++c) bi[c] -= f * bj[c];
        }
    }
}

// The inverse of a triangular factor in place, one column at a time: the reciprocal of the
// diagonal, then the updates of the rest of the column, accumulated in the column itself. Lower
// columns run forward, upper ones backward, so the columns still read are never yet overwritten.
template <class T>
void InvertTriangle(T* t, int32_t n, int32_t kind) {
    const auto at = [&](int32_t i, int32_t j) -> T& { return t[kind == 1 ? UpperAt(i, j) : LowerAt(n, i, j)]; };
    for (int32_t step = 0; step < n; ++step) {
        const int32_t j = kind == 1 ? n - 1 - step : step;
        const T d = Divide(T(1), at(j, j));
        at(j, j) = d;
        // Rows of the column other than the diagonal, in the order of elimination.
        const int32_t first = kind == 1 ? 0 : j + 1, last = kind == 1 ? j - 1 : n - 1;
        for (int32_t i = first; i <= last; ++i) at(i, j) *= d;
        for (int32_t s = 1; s <= last - first + 1; ++s) {
            const int32_t r = kind == 1 ? j - s : j + s;
            T& x = at(r, j);
            x = -Divide(x, at(r, r));
            const int32_t from = kind == 1 ? 0 : r + 1, to = kind == 1 ? r - 1 : n - 1;
            for (int32_t i = from; i <= to; ++i) at(i, j) += at(i, r) * x;
        }
    }
}

// 1 when a diagonal element is negligible: |t_ii| <= M eps for real data, |t_ii|^2 <= M2 factor
// for complex data, M the largest magnitude (M2 the largest |z|^2) in the array.
template <class T>
bool NegligibleDiagonal(const T* t, int32_t n, int32_t kind, double complexFactor) {
    const size_t count = static_cast<size_t>(n) * (n + 1) / 2;
    double largest = 0;
    for (size_t i = 0; i < count; ++i) largest = std::max(largest, kIsComplex<T> ? Abs2(t[i]) : Magnitude(t[i]));
    const double bound = kIsComplex<T> ? largest * complexFactor : largest * kEps;
    for (int32_t i = 0; i < n; ++i) {
        const T d = t[kind == 1 ? UpperAt(i, i) : LowerAt(n, i, i)];
        if ((kIsComplex<T> ? Abs2(d) : Magnitude(d)) <= bound) return true;
    }
    return false;
}

}  // namespace

template <class T> Status CholeskyFactor(T* l, int32_t n) { return FactorLoop<T, true>(l, n); }

template <class T> void CholeskySolveSet(const T* l, int32_t n, T* b, int32_t k) {
    LowerSolve(l, n, b, k);
    LowerConjSolve(l, n, b, k);
}

template <class T> void CholeskySolve(const T* l, const T* b, int32_t n, T* x) {
    if (x != b) std::memcpy(x, b, static_cast<size_t>(n) * sizeof(T));
    CholeskySolveSet(l, n, x, 1);
}

// A^-1 = L^-H L^-1: the lower triangle of column j is the product of the columns of L^-1 from row i
// on with column j, which is kept aside in the workspace before it is overwritten.
template <class T> void CholeskyInverse(T* l, int32_t n, T* column) {
    InvertTriangle(l, n, 0);
    for (int32_t j = 0; j < n; ++j) {
        std::memcpy(column + j, l + LowerAt(n, j, j), static_cast<size_t>(n - j) * sizeof(T));
        for (int32_t i = j; i < n; ++i) {
            const T* xi = i == j ? column + j : l + LowerAt(n, i, i);
            T sum = 0;
            for (int32_t r = i; r < n; ++r) sum += Conj(xi[r - i]) * column[r];
            l[LowerAt(n, i, j)] = sum;
        }
    }
}

template <class T> void PackUpperRows(const T* a, int32_t n, T* compact) {
    size_t k = 0;
    for (int32_t i = 0; i < n; ++i)
        for (int32_t j = i; j < n; ++j) compact[k++] = Conj(a[static_cast<size_t>(i) * n + j]);
}

template <class T> Status FullCholesky(T* a, int32_t n) {
    if constexpr (kIsComplex<T>)
        for (int32_t i = 0; i < n; ++i) a[static_cast<size_t>(i) * n + i].imag(0);
    Scratch<T> l;
    if (l.Allocate(static_cast<size_t>(n) * (n + 1) / 2) != 0) return OutOfMemoryErr;
    PackUpperRows(a, n, l.get());
    Status s = CholeskyFactor(l.get(), n);
    if (s == 0) {
        ExpandCompact(l.get(), n, 0, a);
        s = TransposeMatrix<T, kIsComplex<T>>(a, n, n, nullptr);
    }
    return MergeRelease(s, l.Release());
}

template <class T>
Status SolveByCholesky(const T* a, int32_t n, int32_t triangle, const T* b, int32_t k, T* x) {
    Scratch<T> l;
    if (l.Allocate(static_cast<size_t>(n) * (n + 1) / 2) != 0) return OutOfMemoryErr;
    if (triangle == 0)
        PackCompact(a, n, 0, l.get());
    else
        PackUpperRows(a, n, l.get());
    const size_t nk = static_cast<size_t>(n) * k;
    Status s = Screen(l.get(), n * (n + 1) / 2) || Screen(b, static_cast<int32_t>(nk)) ? NanInfErr : 0;
    if (s == 0) s = CholeskyFactor(l.get(), n);
    if (s == 0) {
        if (x != b) std::memcpy(x, b, nk * sizeof(T));
        CholeskySolveSet(l.get(), n, x, k);
    }
    return MergeRelease(s, l.Release());
}

template <class T> Status InvertByCholesky(T* a, int32_t n) {
    Scratch<T> l, column;
    if (l.Allocate(static_cast<size_t>(n) * (n + 1) / 2) != 0 || column.Allocate(static_cast<size_t>(n)) != 0)
        return OutOfMemoryErr;
    PackCompact(a, n, 0, l.get());
    Status s = Screen(l.get(), n * (n + 1) / 2) ? NanInfErr : CholeskyFactor(l.get(), n);
    if (s == 0) {
        CholeskyInverse(l.get(), n, column.get());
        ExpandCompact(l.get(), n, 2, a);
    }
    return MergeRelease(MergeRelease(s, l.Release()), column.Release());
}

template <class T> Status InvertFromCholesky(T* l, int32_t n) {
    Scratch<T> column;
    if (column.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    CholeskyInverse(l, n, column.get());
    return column.Release();
}

Status PreallocCholeskyInverse(double* a, int32_t n, double* work1, double* work2) {
    PackCompact(a, n, 0, work1);
    const Status s = FactorLoop<double, false>(work1, n);
    CholeskyInverse(work1, n, work2);
    ExpandCompact(work1, n, 2, a);
    return s;
}

template <class T> Status CompactTriSolve(const T* t, int32_t n, const T* b, int32_t k, int32_t kind, T* x) {
    if (kind != 0 && kind != 1) return kIsComplex<T> ? InvalidSelectorErr : 0;
    if (NegligibleDiagonal(t, n, kind, kEps)) return SingularMatrixErr;
    if (x != b) std::memcpy(x, b, static_cast<size_t>(n) * k * sizeof(T));
    if (kind == 0)
        LowerSolve(t, n, x, k);
    else
        UpperSolve(t, n, x, k);
    return 0;
}

template <class T> Status CompactTriInverse(const T* t, int32_t n, int32_t kind, T* out) {
    // The complex test of the inverse is against eps squared, unlike that of the solve.
    constexpr double kEpsSquared = 4.930380657631324e-32;
    if (kind != 0 && kind != 1) return InvalidSelectorErr;
    if (NegligibleDiagonal(t, n, kind, kEpsSquared)) return SingularMatrixErr;
    if (out != t) std::memcpy(out, t, static_cast<size_t>(n) * (n + 1) / 2 * sizeof(T));
    InvertTriangle(out, n, kind);
    return 0;
}

template <class T>
Status SolveTriangular(const T* a, int32_t n, int32_t kind, const T* b, int32_t k, T* x) {
    Scratch<T> t;
    if (t.Allocate(static_cast<size_t>(n) * (n + 1) / 2) != 0) return OutOfMemoryErr;
    PackCompact(a, n, kind, t.get());
    const Status s = CompactTriSolve(t.get(), n, b, k, kind, x);
    return MergeRelease(s, t.Release());
}

template <class T> Status InvertTriangular(T* a, int32_t n, int32_t kind) {
    Scratch<T> t;
    if (t.Allocate(static_cast<size_t>(n) * (n + 1) / 2) != 0) return OutOfMemoryErr;
    PackCompact(a, n, kind, t.get());
    Status s = CompactTriInverse(t.get(), n, kind, t.get());
    if (s == 0) ExpandCompact(t.get(), n, kind, a);
    return MergeRelease(s, t.Release());
}

#define TW_COMPACT_SOLVE(T)                                                                 \
    template Status CholeskyFactor<T>(T*, int32_t);                                         \
    template void CholeskySolve<T>(const T*, const T*, int32_t, T*);                        \
    template void CholeskySolveSet<T>(const T*, int32_t, T*, int32_t);                      \
    template void CholeskyInverse<T>(T*, int32_t, T*);                                      \
    template void PackUpperRows<T>(const T*, int32_t, T*);                                  \
    template Status FullCholesky<T>(T*, int32_t);                                           \
    template Status SolveByCholesky<T>(const T*, int32_t, int32_t, const T*, int32_t, T*);  \
    template Status InvertByCholesky<T>(T*, int32_t);                                       \
    template Status InvertFromCholesky<T>(T*, int32_t);                                     \
    template Status SolveTriangular<T>(const T*, int32_t, int32_t, const T*, int32_t, T*);  \
    template Status InvertTriangular<T>(T*, int32_t, int32_t);                              \
    template Status CompactTriSolve<T>(const T*, int32_t, const T*, int32_t, int32_t, T*);  \
    template Status CompactTriInverse<T>(const T*, int32_t, int32_t, T*);
TW_COMPACT_SOLVE(double)
TW_COMPACT_SOLVE(cdouble)
#undef TW_COMPACT_SOLVE

}  // namespace tw
