// QR decompositions: Householder through LAPACK's LQ of the transposed view, pivoted QR through a
// transposing copy, and the library's own plain and fast Givens forms.
#include <algorithm>
#include <cstring>

#include "frame/frame.hpp"
#include "matrix/decompose.hpp"
#include "matrix/lapack.hpp"

namespace tw {

void QrShape(int32_t m, int32_t n, int32_t option, int32_t* qRows, int32_t* qCols, int32_t* rRows) {
    const int32_t r = std::min(m, n);
    *qRows = option == 2 ? 0 : m;
    *qCols = option == 0 ? m : option == 1 ? r : 0;
    *rRows = option == 0 ? m : r;
}

template <class T>
Status QrHouseholder(const T* a, int32_t m, int32_t n, int32_t option, T* q, T* r) {
    if constexpr (kIsComplex<T>) {
        if (Screen(a, m * n)) return NanInfErr;
    }
    int32_t qRows, qCols, rRows;
    QrShape(m, n, option, &qRows, &qCols, &rRows);
    const int32_t k = std::min(m, n);
    const bool wantQ = q != nullptr && qCols > 0;
    // Read column-major with leading dimension n, the memory is A^T; its LQ gives A = (L Q)^T.
    const int32_t lda = (wantQ && option == 0 && n < m) ? m : n;
    Scratch<T> buffer, tau;
    if (buffer.Allocate(static_cast<size_t>(lda) * m) != 0 || tau.Allocate(static_cast<size_t>(k)) != 0)
        return OutOfMemoryErr;
    T* b = buffer.get();
    for (int32_t i = 0; i < m; ++i)
        std::memcpy(b + static_cast<size_t>(i) * lda, a + static_cast<size_t>(i) * n, static_cast<size_t>(n) * sizeof(T));
    Status s = Gelqf<T>(n, m, b, lda, tau.get());
    if (s == 0 && r != nullptr) {
        std::fill(r, r + static_cast<size_t>(rRows) * n, T(0));
        for (int32_t i = 0; i < k; ++i)
            std::memcpy(r + static_cast<size_t>(i) * n + i, b + static_cast<size_t>(i) * lda + i,
                        static_cast<size_t>(n - i) * sizeof(T));
    }
    if (s == 0 && wantQ) {
        s = Orglq<T>(qCols, m, k, b, lda, tau.get());
        for (int32_t i = 0; s == 0 && i < m; ++i)
            std::memcpy(q + static_cast<size_t>(i) * qCols, b + static_cast<size_t>(i) * lda,
                        static_cast<size_t>(qCols) * sizeof(T));
    }
    return MergeRelease(MergeRelease(s, buffer.Release()), tau.Release());
}

template <class T>
Status QrPivoted(const T* a, int32_t m, int32_t n, int32_t option, int32_t* perm, T* q, T* r) {
    if (Screen(a, m * n)) return NanInfErr;
    int32_t qRows, qCols, rRows;
    QrShape(m, n, option, &qRows, &qCols, &rRows);
    const int32_t k = std::min(m, n);
    const bool wantQ = q != nullptr && qCols > 0;
    // Column-major with leading dimension m; room for the columns of a full Q when it is wider.
    const int32_t cols = std::max(n, wantQ ? qCols : 0);
    Scratch<T> buffer, tau;
    if (buffer.Allocate(static_cast<size_t>(m) * cols) != 0 || tau.Allocate(static_cast<size_t>(k)) != 0)
        return OutOfMemoryErr;
    T* b = buffer.get();
    Status s = TransposeMatrix<T>(const_cast<T*>(a), m, n, b);
    // All columns free: every entry 0 before the call.
    std::fill(perm, perm + n, 0);
    if (s == 0) s = Geqp3<T>(m, n, b, m, perm, tau.get());
    if (s == 0) {
        for (int32_t j = 0; j < n; ++j) --perm[j];
        if (r != nullptr) {
            std::fill(r, r + static_cast<size_t>(rRows) * n, T(0));
            for (int32_t i = 0; i < k; ++i)
                for (int32_t j = i; j < n; ++j) r[static_cast<size_t>(i) * n + j] = b[static_cast<size_t>(j) * m + i];
        }
    }
    if (s == 0 && wantQ) {
        s = Orgqr<T>(m, qCols, k, b, m, tau.get());
        if (s == 0) s = TransposeMatrix<T>(b, qCols, m, q);
    }
    return MergeRelease(MergeRelease(s, buffer.Release()), tau.Release());
}

namespace {

bool Beyond(double x, double d) { return x <= -d || x >= d; }

// The column walk shared by both Givens forms. Rotate(i, j) zeroes r[i][j] against r[i-1][j].
template <class Rotate>
void ColumnWalk(const double* a, int32_t m, int32_t n, double* q, double* r, Rotate rotate) {
    std::memcpy(r, a, static_cast<size_t>(m) * n * sizeof(double));
    std::fill(q, q + static_cast<size_t>(m) * m, 0.0);
    for (int32_t i = 0; i < m; ++i) q[static_cast<size_t>(i) * m + i] = 1;
    const auto R = [&](int32_t i, int32_t j) -> double& { return r[static_cast<size_t>(i) * n + j]; };
    int32_t k = 0;
    for (int32_t j = 0; j < n && k < m; ++j) {
        double c = 0;
        for (int32_t i = 0; i < m; ++i) c += R(i, j) * R(i, j);
        c = std::sqrt(c);
        if (c == 0) continue;
        // A threshold relative to the column, 0 in the first column.
        const double d = c * kEps * j / std::sqrt(static_cast<double>(m - k));
        bool active = Beyond(R(k, j), d);
        for (int32_t i = m - 1; i > k; --i) {
            if (!Beyond(R(i, j), d)) continue;
            active = true;
            rotate(i, j);
        }
        if (active) ++k;
        for (int32_t i = k; i < m; ++i) R(i, j) = 0;
    }
}

// Transposes the accumulated product in place: Q = (G_n ... G_1)^T.
void TransposeSquare(double* q, int32_t m) {
    for (int32_t i = 0; i < m; ++i)
        for (int32_t j = i + 1; j < m; ++j) std::swap(q[static_cast<size_t>(i) * m + j], q[static_cast<size_t>(j) * m + i]);
}

}  // namespace

Status QrGivens(const double* a, int32_t m, int32_t n, double* q, double* r) {
    const auto rows = [&](double* x, int32_t cols, int32_t i, double c, double s) {
        double* u = x + static_cast<size_t>(i - 1) * cols;
        double* w = x + static_cast<size_t>(i) * cols;
        for (int32_t j = 0; j < cols; ++j) {
            const double y = u[j], z = w[j];
            u[j] = c * y + s * z;
            w[j] = c * z - s * y;
        }
    };
    ColumnWalk(a, m, n, q, r, [&](int32_t i, int32_t j) {
        const double x = r[static_cast<size_t>(i - 1) * n + j], y = r[static_cast<size_t>(i) * n + j];
        double c = 1, s = 0;
        if (y != 0) {
            if (std::fabs(y) <= std::fabs(x)) {
                const double t = y / x;
                c = 1 / std::sqrt(1 + t * t);
                s = t * c;
            } else {
                const double t = x / y;
                s = 1 / std::sqrt(1 + t * t);
                c = t * s;
            }
        }
        rows(r, n, i, c, s);
        rows(q, m, i, c, s);
    });
    TransposeSquare(q, m);
    return 0;
}

// Fast Givens after Golub and Van Loan: two multiplications per element and a diagonal scaling D
// that is applied once at the end.
Status QrFastGivens(const double* a, int32_t m, int32_t n, double* q, double* r) {
    Scratch<double> scale;
    if (scale.Allocate(static_cast<size_t>(m)) != 0) return OutOfMemoryErr;
    double* D = scale.get();
    std::fill(D, D + m, 1.0);
    const auto rows = [&](double* x, int32_t cols, int32_t i, bool type1, double alpha, double beta) {
        double* u = x + static_cast<size_t>(i - 1) * cols;
        double* w = x + static_cast<size_t>(i) * cols;
        for (int32_t j = 0; j < cols; ++j) {
            const double y = u[j], z = w[j];
            if (type1) {
                u[j] = beta * y + z;
                w[j] = y + alpha * z;
            } else {
                u[j] = y + beta * z;
                w[j] = alpha * y + z;
            }
        }
    };
    ColumnWalk(a, m, n, q, r, [&](int32_t i, int32_t j) {
        const double x1 = r[static_cast<size_t>(i - 1) * n + j], x2 = r[static_cast<size_t>(i) * n + j];
        double alpha = 0, beta = 0;
        bool type1 = false;
        if (x2 != 0) {
            alpha = -x1 / x2;
            beta = -alpha * D[i] / D[i - 1];
            const double gamma = -alpha * beta;
            if (gamma <= 1) {
                type1 = true;
                const double d1 = D[i - 1];
                D[i - 1] = (1 + gamma) * D[i];
                D[i] = (1 + gamma) * d1;
            } else {
                alpha = 1 / alpha;
                beta = 1 / beta;
                const double g = 1 / gamma;
                D[i - 1] *= 1 + g;
                D[i] *= 1 + g;
            }
        }
        rows(r, n, i, type1, alpha, beta);
        rows(q, m, i, type1, alpha, beta);
    });
    TransposeSquare(q, m);
    for (int32_t i = 0; i < m; ++i) {
        const double d = 1 / std::sqrt(D[i]);
        for (int32_t j = 0; j < n; ++j) r[static_cast<size_t>(i) * n + j] *= d;
        for (int32_t j = 0; j < m; ++j) q[static_cast<size_t>(j) * m + i] *= d;
    }
    return scale.Release();
}

template Status QrHouseholder<double>(const double*, int32_t, int32_t, int32_t, double*, double*);
template Status QrHouseholder<cdouble>(const cdouble*, int32_t, int32_t, int32_t, cdouble*, cdouble*);
template Status QrPivoted<double>(const double*, int32_t, int32_t, int32_t, int32_t*, double*, double*);
template Status QrPivoted<cdouble>(const cdouble*, int32_t, int32_t, int32_t, int32_t*, cdouble*, cdouble*);

}  // namespace tw
