// Sylvester and Lyapunov equations by Bartels-Stewart: optional Schur reduction, the triangular
// solve, and a least-squares fallback when the triangular solve meets close eigenvalues.
#include <algorithm>
#include <cmath>

#include "matrix/decompose.hpp"
#include "matrix/lapack.hpp"
#include "matrix/matrix_functions.hpp"
#include "matrix/solve.hpp"

namespace tw {

namespace {

size_t Count(int32_t m, int32_t n) { return static_cast<size_t>(m) * static_cast<size_t>(n); }

// Minimum-norm solution of the column-major order by order k for the right side b, in place. The
// complex system goes through its real embedding [[Re K, -Im K], [Im K, Re K]].
Status LeastSquares(double* k, int32_t order, double* b, double rcond) { return Gelsd(order, order, k, b, rcond); }
Status LeastSquares(cdouble* k, int32_t order, cdouble* b, double rcond) {
    const int32_t big = 2 * order;
    Scratch<double> e, r;
    if (e.Allocate(Count(big, big)) != 0 || r.Allocate(static_cast<size_t>(big)) != 0) return OutOfMemoryErr;
    for (int32_t j = 0; j < order; ++j)
        for (int32_t i = 0; i < order; ++i) {
            const cdouble z = k[Count(j, order) + i];
            e[Count(j, big) + i] = z.real();
            e[Count(j, big) + order + i] = z.imag();
            e[Count(j + order, big) + i] = -z.imag();
            e[Count(j + order, big) + order + i] = z.real();
        }
    for (int32_t i = 0; i < order; ++i) {
        r[i] = b[i].real();
        r[order + i] = b[i].imag();
    }
    const Status s = Gelsd(big, big, e.get(), r.get(), rcond);
    if (s == 0)
        for (int32_t i = 0; i < order; ++i) b[i] = {r[i], r[order + i]};
    return MergeRelease(MergeRelease(s, e.Release()), r.Release());
}

template <class T> T Adjust(T x, bool conjugate) {
    if constexpr (kIsComplex<T>) return conjugate ? std::conj(x) : x;
    return x;
}

// op of a column-major square block, densely.
template <class T> void Op(const T* t, int32_t n, int32_t trans, T* out) {
    for (int32_t j = 0; j < n; ++j)
        for (int32_t i = 0; i < n; ++i)
            out[Count(j, n) + i] = trans != 0 ? Adjust(t[Count(i, n) + j], true) : t[Count(j, n) + i];
}

// The mn by mn Kronecker system I (x) A + sign B^T (x) I for the column-major Y.
template <class T> Status KroneckerSolve(const T* a, const T* b, int32_t m, int32_t n, int32_t sign, T* c) {
    const int32_t order = m * n;
    Scratch<T> k;
    if (k.Allocate(Count(order, order)) != 0) return OutOfMemoryErr;
    std::fill(k.get(), k.get() + Count(order, order), T(0));
    for (int32_t j = 0; j < n; ++j)
        for (int32_t i = 0; i < m; ++i) {
            const int32_t row = j * m + i;
            for (int32_t p = 0; p < m; ++p) k[Count(j * m + p, order) + row] += a[Count(p, m) + i];
            for (int32_t l = 0; l < n; ++l) k[Count(l * m + i, order) + row] += static_cast<double>(sign) * b[Count(j, n) + l];
        }
    const Status s = LeastSquares(k.get(), order, c, static_cast<double>(order) * kEps);
    return MergeRelease(s, k.Release());
}

// Column by column on a Y with A Y + sign Y B = C, B quasi-triangular (lower: from the last column).
// Diagonal blocks of B are 1 by 1 unless the coupling element reaches the threshold.
template <class T>
Status ColumnSolve(const T* a, const T* b, int32_t m, int32_t n, bool lowerB, int32_t sign, double threshold, T* c) {
    Scratch<T> k, rhs, y;
    if (k.Allocate(Count(2 * m, 2 * m)) != 0 || rhs.Allocate(2 * static_cast<size_t>(m)) != 0 ||
        y.Allocate(Count(m, n)) != 0)
        return OutOfMemoryErr;
    Scratch<bool> done;
    if (done.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    std::fill(done.get(), done.get() + n, false);
    const double sg = sign;
    const auto B = [&](int32_t i, int32_t j) { return b[Count(j, n) + i]; };
    // rhs for column j: c_j - sign sum over solved columns y_l B[l][j].
    const auto rightSide = [&](int32_t j, T* r) {
        for (int32_t i = 0; i < m; ++i) r[i] = c[Count(j, m) + i];
        for (int32_t l = 0; l < n; ++l)
            if (done[l] && B(l, j) != T(0))
                for (int32_t i = 0; i < m; ++i) r[i] -= sg * y[Count(l, m) + i] * B(l, j);
    };
    Status s = 0;
    int32_t j = lowerB ? n - 1 : 0;
    while (s == 0 && j >= 0 && j < n) {
        const int32_t other = lowerB ? j - 1 : j + 1;
        // The coupling element of a 2 by 2 block: below the diagonal of an upper B, above it in a lower one.
        const bool pair = other >= 0 && other < n && Magnitude(B(other, j)) >= threshold;
        if (!pair) {
            const int32_t order = m;
            for (int32_t q = 0; q < m; ++q)
                for (int32_t p = 0; p < m; ++p) k[Count(q, order) + p] = a[Count(q, m) + p];
            for (int32_t p = 0; p < m; ++p) k[Count(p, order) + p] += sg * B(j, j);
            rightSide(j, rhs.get());
            s = LeastSquares(k.get(), order, rhs.get(), 2.0 * m * kEps);
            if (s == 0) std::copy(rhs.get(), rhs.get() + m, y.get() + Count(j, m));
            done[j] = true;
        } else {
            const int32_t p0 = std::min(j, other), p1 = std::max(j, other), order = 2 * m;
            std::fill(k.get(), k.get() + Count(order, order), T(0));
            for (int32_t q = 0; q < m; ++q)
                for (int32_t p = 0; p < m; ++p) {
                    k[Count(q, order) + p] = a[Count(q, m) + p];
                    k[Count(m + q, order) + m + p] = a[Count(q, m) + p];
                }
            for (int32_t p = 0; p < m; ++p) {
                k[Count(p, order) + p] += sg * B(p0, p0);
                k[Count(m + p, order) + p] += sg * B(p1, p0);
                k[Count(p, order) + m + p] += sg * B(p0, p1);
                k[Count(m + p, order) + m + p] += sg * B(p1, p1);
            }
            rightSide(p0, rhs.get());
            rightSide(p1, rhs.get() + m);
            s = LeastSquares(k.get(), order, rhs.get(), 2.0 * m * kEps);
            if (s == 0) {
                std::copy(rhs.get(), rhs.get() + m, y.get() + Count(p0, m));
                std::copy(rhs.get() + m, rhs.get() + 2 * m, y.get() + Count(p1, m));
            }
            done[p0] = done[p1] = true;
            j = other;
        }
        j += lowerB ? -1 : 1;
    }
    if (s == 0) std::copy(y.get(), y.get() + Count(m, n), c);
    return MergeRelease(MergeRelease(MergeRelease(MergeRelease(s, k.Release()), rhs.Release()), y.Release()),
                        done.Release());
}

// The triangular solve on column-major (quasi-)triangular ta (m by m), tb (n by n) and c, with the
// fallback when close eigenvalues had to be perturbed. kronecker tells whether the dense system is
// small enough to try; threshold is the block threshold of the column method.
template <class T>
Status TriangularSylvester(const T* ta, const T* tb, T* c, int32_t m, int32_t n, int32_t transA, int32_t transB,
                           int32_t sign, bool kronecker, double threshold, double* scale, int32_t* perturbed) {
    constexpr char kTrans = kIsComplex<T> ? 'C' : 'T';
    const size_t mn = Count(m, n);
    Scratch<T> saved;
    if (saved.Allocate(mn) != 0) return OutOfMemoryErr;
    std::copy(c, c + mn, saved.get());
    const int info = Trsyl(transA != 0 ? kTrans : 'N', transB != 0 ? kTrans : 'N', sign, m, n, ta, tb, c, scale);
    if (perturbed != nullptr) *perturbed = info > 0 ? 1 : 0;
    if (info < 0) return MergeRelease(InternalErr, saved.Release());
    if (info == 0) return saved.Release();

    Scratch<T> ops;
    if (ops.Allocate(Count(m, m) + Count(n, n)) != 0) return MergeRelease(OutOfMemoryErr, saved.Release());
    T *opA = ops.get(), *opB = opA + Count(m, m);
    Op(ta, m, transA, opA);
    Op(tb, n, transB, opB);
    std::copy(saved.get(), saved.get() + mn, c);
    Status s = kronecker ? KroneckerSolve(opA, opB, m, n, sign, c) : OutOfMemoryErr;
    if (s == OutOfMemoryErr) {
        std::copy(saved.get(), saved.get() + mn, c);
        if (m >= n) {
            s = ColumnSolve(opA, opB, m, n, transB != 0, sign, threshold, c);
        } else {
            // Solve the transposed problem op(B)^T Z + sign Z op(A)^T = sign C^T, Z = Y^T.
            Scratch<T> ta2, tb2, z;
            if (ta2.Allocate(Count(n, n)) != 0 || tb2.Allocate(Count(m, m)) != 0 || z.Allocate(mn) != 0) {
                s = OutOfMemoryErr;
            } else {
                for (int32_t j = 0; j < n; ++j)
                    for (int32_t i = 0; i < n; ++i) ta2[Count(j, n) + i] = opB[Count(i, n) + j];
                for (int32_t j = 0; j < m; ++j)
                    for (int32_t i = 0; i < m; ++i) tb2[Count(j, m) + i] = opA[Count(i, m) + j];
                for (int32_t j = 0; j < n; ++j)
                    for (int32_t i = 0; i < m; ++i) z[Count(i, n) + j] = static_cast<double>(sign) * c[Count(j, m) + i];
                s = ColumnSolve(ta2.get(), tb2.get(), n, m, transA == 0, sign, static_cast<double>(n) * kEps, z.get());
                if (s == 0)
                    for (int32_t j = 0; j < n; ++j)
                        for (int32_t i = 0; i < m; ++i) c[Count(j, m) + i] = z[Count(i, n) + j];
            }
        }
    }
    if (s == 0) *scale = 1.0;
    return MergeRelease(MergeRelease(s, ops.Release()), saved.Release());
}

// c = op1(u) c op2(v) on column-major blocks: the Schur transformations of the right side and back.
template <class T>
void Transform(const T* u, int32_t transU, const T* c, const T* v, int32_t transV, int32_t m, int32_t n, T* tmp, T* out) {
    const int tu = transU != 0 ? (kIsComplex<T> ? CblasConjTrans : CblasTrans) : CblasNoTrans;
    const int tv = transV != 0 ? (kIsComplex<T> ? CblasConjTrans : CblasTrans) : CblasNoTrans;
    if constexpr (kIsComplex<T>) {
        const cdouble one = 1.0, zero = 0.0;
        cblas_zgemm(CblasColMajor, tu, CblasNoTrans, m, n, m, &one, u, m, c, m, &zero, tmp, m);
        cblas_zgemm(CblasColMajor, CblasNoTrans, tv, m, n, n, &one, tmp, m, v, n, &zero, out, m);
    } else {
        cblas_dgemm(CblasColMajor, tu, CblasNoTrans, m, n, m, 1.0, u, m, c, m, 0.0, tmp, m);
        cblas_dgemm(CblasColMajor, CblasNoTrans, tv, m, n, n, 1.0, tmp, m, v, n, 0.0, out, m);
    }
}

Status Schur(int32_t n, double* t, double* u) {
    Scratch<double> w;
    if (w.Allocate(2 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    int sdim = 0;
    const Status s = Gees(n, t, nullptr, &sdim, w.get(), w.get() + n, u);
    return MergeRelease(s, w.Release());
}
Status Schur(int32_t n, cdouble* t, cdouble* u) {
    Scratch<cdouble> w;
    if (w.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    int sdim = 0;
    const Status s = Gees(n, t, nullptr, &sdim, w.get(), u);
    return MergeRelease(s, w.Release());
}

// The continuous equation on row-major a and q; X replaces q.
template <class T> Status ContinuousLyapunov(const T* a, T* q, int32_t n, int32_t form, double* scale) {
    const size_t nn = Count(n, n);
    Scratch<T> work;
    if (work.Allocate(4 * nn) != 0) return OutOfMemoryErr;
    T *t = work.get(), *c = t + nn, *u = c + nn, *tmp = u + nn;
    Status s = TransposeMatrix<T>(const_cast<T*>(a), n, n, t);
    if (s == 0) s = TransposeMatrix<T>(q, n, n, c);
    if (s == 0 && form == 0) {
        s = Schur(n, t, u);
        if (s == 0) Transform(u, 1, c, u, 0, n, n, tmp, c);
    }
    constexpr int32_t limit = kIsComplex<T> ? 26 : 41;
    if (s == 0)
        s = TriangularSylvester(t, t, c, n, n, 0, 1, 1, n < limit, static_cast<double>(n) * kEps, scale, nullptr);
    if (s == 0) {
        if (form == 0) {
            Transform(u, 0, c, u, 1, n, n, tmp, c);
            if constexpr (kIsComplex<T>) {
                // The column-major product is copied with its imaginary parts negated, not
                // transposed: the caller receives X^H, which is X for a Hermitian Q.
                for (size_t i = 0; i < nn; ++i) q[i] = std::conj(c[i]);
            } else {
                s = TransposeMatrix<T>(c, n, n, q);
            }
        } else {
            s = TransposeMatrix<T>(c, n, n, q);
        }
    }
    return MergeRelease(s, work.Release());
}

}  // namespace

template <class T> Status Lyapunov(const T* a, T* q, int32_t n, int32_t form, int32_t type, double* scale) {
    if (n < 1) return EmptyArrayErr;
    if (form != 0 && form != 1) return InvalidSelectorErr;
    if (static_cast<uint32_t>(type) > 1) return InvalidSelectorErr;
    if (Screen(a, n * n) || Screen(q, n * n)) return NanInfErr;
    if (type == 0) return ContinuousLyapunov(a, q, n, form, scale);
    // Cayley: with P = A + I and F = P^-1 (A - I), F X + X F^H = 2 P^-1 Q P^-H.
    const size_t nn = Count(n, n);
    Scratch<T> work;
    if (work.Allocate(4 * nn) != 0) return OutOfMemoryErr;
    T *p = work.get(), *f = p + nn, *tmp = f + nn, *qq = tmp + nn;
    std::copy(a, a + nn, p);
    std::copy(a, a + nn, f);
    for (int32_t i = 0; i < n; ++i) {
        p[Count(i, n) + i] += 1.0;
        f[Count(i, n) + i] -= 1.0;
    }
    Status s;
    if constexpr (kIsComplex<T>)
        s = form == 0 ? InvertByLu(p, n) : InvertTriangular(p, n, 1);
    else
        s = InvertByLu(p, n);
    if (s == 0) s = MatMul<T>(p, f, n, n, n, tmp, 0);
    if (s == 0) {
        std::copy(tmp, tmp + nn, f);
        s = MatMul<T>(p, q, n, n, n, tmp, 0);
    }
    if (s == 0) {
        // tmp P^H, row-major.
        for (int32_t i = 0; i < n; ++i)
            for (int32_t j = 0; j < n; ++j) {
                T sum = 0;
                for (int32_t k = 0; k < n; ++k) sum += tmp[Count(i, n) + k] * Conj(p[Count(j, n) + k]);
                qq[Count(i, n) + j] = 2.0 * sum;
            }
        s = ContinuousLyapunov(f, qq, n, form, scale);
    }
    if (s == 0) std::copy(qq, qq + nn, q);
    return MergeRelease(s, work.Release());
}

template <class T>
Status Sylvester(const T* a, const T* b, T* c, int32_t m, int32_t n, int32_t transA, int32_t transB, int32_t sign,
                 int32_t form, double* scale, int32_t* perturbed) {
    if (m < 1 || n < 1) return EmptyArrayErr;
    if (static_cast<uint32_t>(transA) > 1 || static_cast<uint32_t>(transB) > 1 || (sign != 1 && sign != -1) ||
        static_cast<uint32_t>(form) > 1)
        return InvalidSelectorErr;
    if (Screen(a, m * m) || Screen(b, n * n) || Screen(c, m * n)) return NanInfErr;
    const size_t mm = Count(m, m), nn = Count(n, n), mn = Count(m, n);
    Scratch<T> work;
    if (work.Allocate(2 * mm + 2 * nn + 2 * mn) != 0) return OutOfMemoryErr;
    T *ta = work.get(), *u = ta + mm, *tb = u + mm, *v = tb + nn, *cc = v + nn, *tmp = cc + mn;
    Status s = TransposeMatrix<T>(const_cast<T*>(a), m, m, ta);
    if (s == 0) s = TransposeMatrix<T>(const_cast<T*>(b), n, n, tb);
    if (s == 0) s = TransposeMatrix<T>(c, m, n, cc);
    if (s == 0 && form == 0) {
        s = Schur(m, ta, u);
        if (s == 0) s = Schur(n, tb, v);
        if (s == 0) Transform(u, 1, cc, v, 0, m, n, tmp, cc);
    }
    constexpr size_t limit = kIsComplex<T> ? 801 : 1601;
    if (s == 0)
        s = TriangularSylvester(ta, tb, cc, m, n, transA, transB, sign, mn < limit, static_cast<double>(m) * kEps,
                                scale, perturbed);
    if (s == 0 && form == 0) Transform(u, 0, cc, v, 1, m, n, tmp, cc);
    // Column-major m by n back to row-major.
    if (s == 0)
        for (int32_t i = 0; i < m; ++i)
            for (int32_t j = 0; j < n; ++j) c[Count(i, n) + j] = cc[Count(j, m) + i];
    return MergeRelease(s, work.Release());
}

template Status Lyapunov<double>(const double*, double*, int32_t, int32_t, int32_t, double*);
template Status Lyapunov<cdouble>(const cdouble*, cdouble*, int32_t, int32_t, int32_t, double*);
template Status Sylvester<double>(const double*, const double*, double*, int32_t, int32_t, int32_t, int32_t, int32_t,
                                  int32_t, double*, int32_t*);
template Status Sylvester<cdouble>(const cdouble*, const cdouble*, cdouble*, int32_t, int32_t, int32_t, int32_t,
                                   int32_t, int32_t, double*, int32_t*);

}  // namespace tw
