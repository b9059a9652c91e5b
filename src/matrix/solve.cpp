// The LU drivers, the band and tridiagonal routes, and the determinant.
#include <algorithm>
#include <cstring>

#include "frame/frame.hpp"
#include "matrix/lapack.hpp"
#include "matrix/solve.hpp"

namespace tw {

template <class T> Status SolveByLu(const T* a, int32_t rows, int32_t n, const T* b, T* x) {
    const size_t nn = static_cast<size_t>(n) * n;
    Scratch<T> lu;
    Scratch<int32_t> perm;
    if (lu.Allocate(nn) != 0 || perm.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    // The order is the column count; a short matrix is completed with zero rows, which makes it
    // singular rather than read beyond its end.
    const size_t have = static_cast<size_t>(std::min(rows, n)) * n;
    std::memcpy(lu.get(), a, have * sizeof(T));
    std::fill(lu.get() + have, lu.get() + nn, T(0));
    int32_t parity = 0;
    Status s = LuFactorSquare(lu.get(), n, perm.get(), &parity);
    if (s == SingularPivotWarn) s = SingularMatrixErr;
    if (s == 0) s = LuSolve(lu.get(), perm.get(), const_cast<T*>(b), n, x);
    return MergeRelease(MergeRelease(s, lu.Release()), perm.Release());
}

template <class T> Status InvertByLu(T* a, int32_t n) {
    Scratch<int32_t> perm;
    if (perm.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    int32_t parity = 0;
    Status s = LuFactorSquare(a, n, perm.get(), &parity);
    if (s == SingularPivotWarn) s = SingularMatrixErr;
    if (s == 0) s = LuInverse(a, perm.get(), n, a);
    return MergeRelease(s, perm.Release());
}

template <class T> Status BandSolve(const T* ab, int32_t n, int32_t kl, int32_t ku, T* b, int32_t nrhs) {
    if (n < 1 || nrhs < 1) return EmptyArrayErr;
    if (kl < 0 || ku < 0 || n < kl + ku + 1) return SizeMismatchErr;
    const int32_t ldab = 2 * kl + ku + 1, band = kl + ku + 1;
    Scratch<T> buffer, columns;
    Scratch<int32_t> ipiv;
    if (buffer.Allocate(static_cast<size_t>(ldab) * n) != 0 || ipiv.Allocate(static_cast<size_t>(n)) != 0 ||
        (nrhs > 1 && columns.Allocate(static_cast<size_t>(n) * nrhs) != 0))
        return OutOfMemoryErr;
    // Rows kl.. of each buffer column take the host's band column; the first kl rows are room for
    // the fill-in of the pivoting.
    T* buf = buffer.get();
    std::fill(buf, buf + static_cast<size_t>(ldab) * n, T(0));
    for (int32_t j = 0; j < n; ++j)
        for (int32_t r = 0; r < band; ++r) buf[static_cast<size_t>(j) * ldab + kl + r] = ab[static_cast<size_t>(r) * n + j];
    T* x = b;
    Status s = 0;
    if (nrhs > 1) {
        x = columns.get();
        s = TransposeMatrix<T>(b, n, nrhs, x);
    }
    if (s == 0) s = Gbsv<T>(n, kl, ku, nrhs, buf, ldab, ipiv.get(), x, n);
    if (s == 0 && nrhs > 1) s = TransposeMatrix<T>(x, nrhs, n, b);
    return MergeRelease(MergeRelease(MergeRelease(s, buffer.Release()), columns.Release()), ipiv.Release());
}

Status TriDiagFactor(double* dl, double* d, double* du, double* du2, int32_t* ipiv, int32_t n) {
    const size_t m = static_cast<size_t>(n) - 1;
    Scratch<double> copy;
    if (copy.Allocate(3 * m + 1) != 0) return OutOfMemoryErr;
    double* cdl = copy.get();
    double* cd = cdl + m;
    double* cdu = cd + n;
    std::memcpy(cdl, dl, m * sizeof(double));
    std::memcpy(cd, d, static_cast<size_t>(n) * sizeof(double));
    std::memcpy(cdu, du, m * sizeof(double));
    const Status s = Gttrf(n, cdl, cd, cdu, du2, ipiv);
    if (s == 0) {
        std::memcpy(dl, cdl, m * sizeof(double));
        std::memcpy(d, cd, static_cast<size_t>(n) * sizeof(double));
        std::memcpy(du, cdu, m * sizeof(double));
    }
    return MergeRelease(s, copy.Release());
}

Status TriDiagSolve(int32_t trans, const double* dl, const double* d, const double* du, const double* du2,
                    const int32_t* ipiv, int32_t n, double* b, int32_t nrhs) {
    // The solve follows the interchanges without checking them: each must name its own row or the
    // next one, as the factorisation writes them.
    for (int32_t i = 0; i + 1 < n; ++i)
        if (ipiv[i] != i + 1 && ipiv[i] != i + 2) return IndexRangeErr;
    Scratch<double> columns;
    double* x = b;
    Status s = 0;
    if (nrhs > 1) {
        if (columns.Allocate(static_cast<size_t>(n) * nrhs) != 0) return OutOfMemoryErr;
        x = columns.get();
        s = TransposeMatrix<double>(b, n, nrhs, x);
    }
    if (s == 0) s = Gttrs(trans == 0 ? 'N' : 'T', n, nrhs, dl, d, du, du2, ipiv, x, n);
    if (s == 0 && nrhs > 1) s = TransposeMatrix<double>(x, nrhs, n, b);
    return MergeRelease(s, columns.Release());
}

template <class T> Status Determinant(const T* a, int32_t n, int32_t type, T* result) {
    if (static_cast<uint32_t>(type) > 3) return InvalidSelectorErr;
    if (Screen(a, n * n)) return NanInfErr;
    const auto A = [&](int32_t i, int32_t j) { return a[static_cast<size_t>(i) * n + j]; };
    if (n == 2) {
        *result = A(0, 0) * A(1, 1) - A(1, 0) * A(0, 1);
        return 0;
    }
    if (type >= 2) {
        T product = 1;
        for (int32_t i = 0; i < n; ++i) product *= A(i, i);
        *result = product;
        return 0;
    }
    Scratch<T> copy;
    Scratch<int32_t> perm;
    const size_t size = type == 0 ? static_cast<size_t>(n) * n : static_cast<size_t>(n) * (n + 1) / 2;
    if (copy.Allocate(size) != 0 || (type == 0 && perm.Allocate(static_cast<size_t>(n)) != 0)) return OutOfMemoryErr;
    T* c = copy.get();
    Status s = 0;
    T product = 1;
    if (type == 0) {
        std::memcpy(c, a, size * sizeof(T));
        int32_t parity = 0;
        s = LuFactorSquare(c, n, perm.get(), &parity);
        for (int32_t i = 0; i < n; ++i) product *= c[static_cast<size_t>(i) * n + i];
        if (parity != 0) product = -product;
        // A singular matrix has determinant 0; that is an answer, not a failure.
        if (s == SingularPivotWarn) s = 0, product = 0;
    } else {
        PackCompact(a, n, 0, c);
        s = CholeskyFactor(c, n);
        for (int32_t i = 0; i < n; ++i) product *= c[LowerAt(n, i, i)];
        product *= product;
    }
    if (s == 0) *result = product;
    return MergeRelease(MergeRelease(s, copy.Release()), perm.Release());
}

#define TW_SOLVE(T)                                                                  \
    template Status SolveByLu<T>(const T*, int32_t, int32_t, const T*, T*);          \
    template Status InvertByLu<T>(T*, int32_t);                                      \
    template Status BandSolve<T>(const T*, int32_t, int32_t, int32_t, T*, int32_t);  \
    template Status Determinant<T>(const T*, int32_t, int32_t, T*);
TW_SOLVE(double)
TW_SOLVE(cdouble)
#undef TW_SOLVE

}  // namespace tw
