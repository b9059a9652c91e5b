// Least squares and pseudo-inverses through the library's own SVD.
#include <algorithm>
#include <cstring>

#include "frame/frame.hpp"
#include "matrix/solve.hpp"

namespace tw {

namespace {

size_t Product(int32_t a, int32_t b) { return static_cast<size_t>(a) * static_cast<size_t>(b); }

// The economy factors of an SVD carved out of one work area.
template <class T>
struct SvdBlocks {
    T* u;       // m by r
    double* s;  // r, in r elements of T
    T* v;       // n by r
    T* rest;    // what follows the three

    SvdBlocks(T* work, int32_t m, int32_t n) {
        const int32_t r = std::min(m, n);
        u = work;
        s = reinterpret_cast<double*>(u + Product(m, r));
        v = u + Product(m, r) + static_cast<size_t>(r);
        rest = v + Product(n, r);
    }
};

// V becomes V diag(1/s) with the columns of values at or below cutoff cleared; w = V U^H, n by m.
// uh needs r m elements. Returns the number of values kept.
template <class T>
int32_t PseudoInverseFromSvd(const T* u, const double* s, T* v, int32_t m, int32_t n, double cutoff, T* uh, T* w,
                             Status* status) {
    const int32_t r = std::min(m, n);
    int32_t kept = 0;
    for (int32_t c = 0; c < r; ++c) {
        const bool keep = s[c] > cutoff;
        const double scale = keep ? 1 / s[c] : 0.0;
        kept += keep;
        for (int32_t i = 0; i < n; ++i) {
            T& x = v[Product(i, r) + c];
            x = keep ? x * scale : T(0);
        }
    }
    *status = TransposeMatrix<T, kIsComplex<T>>(const_cast<T*>(u), m, r, uh);
    if (*status == 0) *status = MatMul<T>(v, uh, n, r, m, w, 0);
    return kept;
}

}  // namespace

template <class T> size_t SvdSolveWorkSize(int32_t m, int32_t n) {
    const int32_t r = std::min(m, n);
    // U, s, V, the pseudo-inverse, and the SVD's own work, which later holds U^H (r m fits in it).
    return Product(m, r) + static_cast<size_t>(r) + Product(n, r) + Product(n, m) + SvdWorkSize<T>(m, n);
}

template <class T>
Status ReentrantSolveBySvd(const T* a, int32_t m, int32_t n, const T* b, int32_t k, T* x, double tol, T* work,
                           size_t* needed) {
    if (m < 1 || n < 1) return EmptyArrayErr;
    if (needed != nullptr) *needed = SvdSolveWorkSize<T>(m, n);
    if (work == nullptr) return 0;
    if (Screen(b, static_cast<int32_t>(Product(m, k)))) return NanInfErr;
    const int32_t r = std::min(m, n);
    SvdBlocks<T> f(work, m, n);
    T* w = f.rest;
    T* svdWork = w + Product(n, m);
    if (const Status s = ReentrantSvd<T>(a, m, n, f.u, f.s, f.v, svdWork, nullptr)) return s;
    if (!(tol > 0)) tol = kEps;
    Status s = 0;
    const int32_t kept = PseudoInverseFromSvd(f.u, f.s, f.v, m, n, std::max(m, n) * f.s[0] * tol, svdWork, w, &s);
    if (s == 0) s = MatMul<T>(w, b, n, m, k, x, 0);
    return s == 0 && kept < r ? RankDeficientWarn : s;
}

template <class T>
Status SolveBySvd(const T* a, int32_t m, int32_t n, const T* b, int32_t k, T* x, double tol) {
    size_t needed = 0;
    if (const Status s = ReentrantSolveBySvd<T>(a, m, n, b, k, x, tol, nullptr, &needed)) return s;
    // b is read only after the pseudo-inverse is complete, so a private copy makes x = b legal.
    const size_t bCount = x == b ? Product(m, k) : 0;
    Scratch<T> work;
    if (work.Allocate(needed + bCount) != 0) return OutOfMemoryErr;
    const T* rhs = b;
    if (bCount != 0) {
        std::memcpy(work.get() + needed, b, bCount * sizeof(T));
        rhs = work.get() + needed;
    }
    const Status s = ReentrantSolveBySvd<T>(a, m, n, rhs, k, x, tol, work.get(), nullptr);
    return MergeRelease(s, work.Release());
}

template <class T> size_t SvdRefineWorkSize(int32_t m, int32_t n) {
    const int32_t r = std::min(m, n);
    // U, s, V, the residual, U^H r, and the SVD's own work.
    return Product(m, r) + static_cast<size_t>(r) + Product(n, r) + static_cast<size_t>(m) + static_cast<size_t>(r) +
           SvdWorkSize<T>(m, n);
}

template <class T>
Status RefinedSolveBySvd(const T* a, int32_t m, int32_t n, const T* b, T* x, double tol, int32_t refinements, T* work,
                         size_t* needed) {
    if (refinements < 1) return ReentrantSolveBySvd<T>(a, m, n, b, 1, x, tol, work, needed);
    if (m < 1 || n < 1) return EmptyArrayErr;
    if (needed != nullptr) *needed = SvdRefineWorkSize<T>(m, n);
    if (work == nullptr) return 0;
    if (Screen(b, m)) return NanInfErr;
    const int32_t r = std::min(m, n);
    SvdBlocks<T> f(work, m, n);
    T* residual = f.rest;
    T* w = residual + m;
    if (const Status s = ReentrantSvd<T>(a, m, n, f.u, f.s, f.v, w + r, nullptr)) return s;
    if (!(tol > 0)) tol = kEps;
    // No max(m, n) factor in this cut-off.
    const double cutoff = f.s[0] * tol;
    int32_t kept = 0;
    for (int32_t c = 0; c < r; ++c) kept += f.s[c] > cutoff;
    std::fill(x, x + n, T(0));
    for (int32_t pass = 0; pass < refinements; ++pass) {
        AxVect(a, m, n, x, residual);
        for (int32_t i = 0; i < m; ++i) residual[i] = b[i] - residual[i];
        for (int32_t c = 0; c < r; ++c) {
            T sum = 0;
            for (int32_t i = 0; i < m; ++i) sum += Conj(f.u[Product(i, r) + c]) * residual[i];
            w[c] = f.s[c] > cutoff ? sum / f.s[c] : T(0);
        }
        for (int32_t i = 0; i < n; ++i) {
            T sum = 0;
            for (int32_t c = 0; c < r; ++c) sum += f.v[Product(i, r) + c] * w[c];
            x[i] += sum;
        }
    }
    return kept < r ? RankDeficientWarn : 0;
}

template <class T> Status PseudoInverse(const T* a, int32_t m, int32_t n, double tol, T* out) {
    if (m < 1 || n < 1) return EmptyArrayErr;
    // The layout of the solve without its n by m block: out takes the pseudo-inverse.
    Scratch<T> work;
    if (work.Allocate(SvdSolveWorkSize<T>(m, n) - Product(n, m)) != 0) return OutOfMemoryErr;
    SvdBlocks<T> f(work.get(), m, n);
    Status s = ReentrantSvd<T>(a, m, n, f.u, f.s, f.v, f.rest, nullptr);
    if (s == 0) {
        const double cutoff = tol < 0 ? std::max(m, n) * f.s[0] * kEps : tol;
        PseudoInverseFromSvd(f.u, f.s, f.v, m, n, cutoff, f.rest, out, &s);
    }
    return MergeRelease(s, work.Release());
}

#define TW_SVD_SOLVE(T)                                                                                    \
    template size_t SvdSolveWorkSize<T>(int32_t, int32_t);                                                 \
    template Status ReentrantSolveBySvd<T>(const T*, int32_t, int32_t, const T*, int32_t, T*, double, T*,  \
                                           size_t*);                                                       \
    template Status SolveBySvd<T>(const T*, int32_t, int32_t, const T*, int32_t, T*, double);              \
    template size_t SvdRefineWorkSize<T>(int32_t, int32_t);                                                \
    template Status RefinedSolveBySvd<T>(const T*, int32_t, int32_t, const T*, T*, double, int32_t, T*,    \
                                         size_t*);                                                         \
    template Status PseudoInverse<T>(const T*, int32_t, int32_t, double, T*);
TW_SVD_SOLVE(double)
TW_SVD_SOLVE(cdouble)
#undef TW_SVD_SOLVE

}  // namespace tw
