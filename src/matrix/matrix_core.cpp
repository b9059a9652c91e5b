#include "matrix/matrix_core.hpp"

#include <algorithm>
#include <bit>
#include <cstring>
#include <limits>

#include "frame/frame.hpp"
#include "matrix/decompose.hpp"
#include "matrix/lapack.hpp"

namespace tw {

namespace {

constexpr double kLargest = 1.7976931348623157e308;
// The lower bound is a few ulps inside -kLargest: the two bounds differ on purpose.
constexpr double kLowest = std::bit_cast<double>(uint64_t{0xFFEFFFFFFFFFFFB0});

bool Fails(double x) { return !std::isfinite(x) || x == kLargest || x <= kLowest; }

// Rows of a and c per cblas_dgemm call for tall products.
constexpr int32_t kPanelRows = 1530;

void Gemm(const double* a, const double* b, int32_t m, int32_t k, int32_t p, double* c) {
    if (m >= kPanelRows + 1 && k >= 257 && p >= 3) {
        const int32_t panels = m / kPanelRows, rest = m % kPanelRows;
        for (int32_t i = 0; i < panels; ++i) {
            const size_t row = static_cast<size_t>(i) * kPanelRows;
            cblas_dgemm(CblasRowMajor, CblasNoTrans, CblasNoTrans, kPanelRows, p, k, 1.0, a + row * k, k, b,
                        p, 0.0, c + row * p, p);
        }
        if (rest > 0) {
            const size_t row = static_cast<size_t>(panels) * kPanelRows;
            cblas_dgemm(CblasRowMajor, CblasNoTrans, CblasNoTrans, rest, p, k, 1.0, a + row * k, k, b, p,
                        0.0, c + row * p, p);
        }
        return;
    }
    cblas_dgemm(CblasRowMajor, CblasNoTrans, CblasNoTrans, m, p, k, 1.0, a, k, b, p, 0.0, c, p);
}

void Gemm(const cdouble* a, const cdouble* b, int32_t m, int32_t k, int32_t p, cdouble* c) {
    const cdouble one = 1.0, zero = 0.0;
    cblas_zgemm(CblasRowMajor, CblasNoTrans, CblasNoTrans, m, p, k, &one, a, k, b, p, &zero, c, p);
}

}  // namespace

int32_t HasNonFinite(const double* x, int32_t n) {
    for (int32_t i = 0; i < n; ++i)
        if (Fails(x[i])) return 1;
    return 0;
}

int32_t CxHasNonFinite(const cdouble* x, int32_t n) {
    for (int32_t i = 0; i < n; ++i)
        if (Fails(x[i].real()) || Fails(x[i].imag())) return 1;
    return 0;
}

template <class T, bool Conjugate>
Status TransposeMatrix(T* src, int32_t m, int32_t n, T* dst) {
    if (m < 1 || n < 1) return EmptyArrayErr;
    const size_t count = static_cast<size_t>(m) * n;
    if (m == 1 || n == 1) {
        if (dst != nullptr && dst != src) std::memcpy(dst, src, count * sizeof(T));
        if constexpr (Conjugate) {
            T* out = dst != nullptr ? dst : src;
            for (size_t i = 0; i < count; ++i) out[i] = Conj(out[i]);
        }
        return 0;
    }
    Scratch<T> copy;
    T* out = dst;
    if (dst == nullptr) {
        if (const Status s = copy.Allocate(count)) return s;
        out = copy.get();
    }
    for (int32_t i = 0; i < m; ++i)
        for (int32_t j = 0; j < n; ++j) {
            const T v = src[static_cast<size_t>(i) * n + j];
            out[static_cast<size_t>(j) * m + i] = Conjugate ? Conj(v) : v;
        }
    if (dst == nullptr) std::memcpy(src, out, count * sizeof(T));
    return copy.Release();
}

template <class T>
Status MatMul(const T* a, const T* b, int32_t m, int32_t k, int32_t p, T* c, int32_t privateCopies) {
    if (m < 0 || k < 0 || p < 0) return NegativeSizeErr;
    if (m == 0 || p == 0) return 0;
    const size_t mk = static_cast<size_t>(m) * k, kp = static_cast<size_t>(k) * p,
                 mp = static_cast<size_t>(m) * p;
    if (k == 0) {
        // The product with an empty inner dimension is defined as NaN, not as 0.
        std::fill(c, c + mp, T(kNaN));
        return 0;
    }
    Scratch<T> copies;
    T* out = c;
    if (privateCopies != 0) {
        // Operands that no longer lie in host blocks, whose elements may be poorly aligned.
        if (copies.Allocate(mk + kp + mp) != 0) return OutOfMemoryErr;
        T* ac = copies.get();
        T* bc = ac + mk;
        std::memcpy(ac, a, mk * sizeof(T));
        std::memcpy(bc, b, kp * sizeof(T));
        a = ac, b = bc, out = bc + kp;
    }
    std::fill(out, out + mp, T(0));
    Gemm(a, b, m, k, p, out);
    if (out != c) std::memcpy(c, out, mp * sizeof(T));
    return copies.Release();
}

template <class T>
void AxVect(const T* a, int32_t m, int32_t n, const T* x, T* y) {
    for (int32_t i = 0; i < m; ++i) {
        const T* row = a + static_cast<size_t>(i) * n;
        T sum = 0;
        for (int32_t j = 0; j < n; ++j) sum += row[j] * x[j];
        y[i] = sum;
    }
}

template <class T>
Status SingularValues(const T* a, int32_t m, int32_t n, double* s) {
    return FullSvd<T>(a, m, n, nullptr, s, nullptr);
}

namespace {

// The norm without the screen, for matrices the library made itself.
template <class T>
Status NormOf(const T* a, int32_t m, int32_t n, int32_t type, double* result) {
    double norm = 0;
    switch (type) {
        case 0: {
            Scratch<double> s;
            if (const Status st = s.Allocate(static_cast<size_t>(std::min(m, n)))) return st;
            if (const Status st = SingularValues(a, m, n, s.get())) return st;
            norm = s[0];
            if (const Status st = s.Release()) return st;
            break;
        }
        case 1:
            for (int32_t j = 0; j < n; ++j) {
                double sum = 0;
                for (int32_t i = 0; i < m; ++i) sum += Magnitude(a[static_cast<size_t>(i) * n + j]);
                norm = std::max(norm, sum);
            }
            break;
        case 2:
            for (size_t i = 0, count = static_cast<size_t>(m) * n; i < count; ++i) norm += Abs2(a[i]);
            norm = std::sqrt(norm);
            break;
        case 3:
            for (int32_t i = 0; i < m; ++i) {
                double sum = 0;
                for (int32_t j = 0; j < n; ++j) sum += Magnitude(a[static_cast<size_t>(i) * n + j]);
                norm = std::max(norm, sum);
            }
            break;
        default: return InvalidSelectorErr;
    }
    *result = norm;
    return 0;
}

}  // namespace

template <class T>
Status MatrixNorm(const T* a, int32_t m, int32_t n, int32_t type, double* result) {
    *result = kNaN;
    if (Screen(a, m * n)) return NanInfErr;
    return NormOf(a, m, n, type, result);
}

template <class T>
Status MatrixRank(const T* a, int32_t m, int32_t n, double tol, int32_t* rank) {
    const int32_t r = std::min(m, n);
    Scratch<double> s;
    if (const Status st = s.Allocate(static_cast<size_t>(r))) return st;
    if (const Status st = SingularValues(a, m, n, s.get())) return st;
    if (tol < 0) tol = std::max(m, n) * s[0] * kEps;
    int32_t count = 0;
    for (int32_t i = 0; i < r; ++i)
        if (s[i] > tol) ++count;
    *rank = count;
    return s.Release();
}

template <class T>
Status ConditionNumber(const T* a, int32_t m, int32_t n, int32_t type, double* cond) {
    *cond = kNaN;
    if (Screen(a, m * n)) return NanInfErr;
    if (static_cast<uint32_t>(type) > 3) return InvalidSelectorErr;
    if (type == 0) {
        const int32_t r = std::min(m, n);
        Scratch<double> s;
        if (const Status st = s.Allocate(static_cast<size_t>(r))) return st;
        if (const Status st = SingularValues(a, m, n, s.get())) return st;
        *cond = s[r - 1] == 0 ? std::numeric_limits<double>::infinity() : s[0] / s[r - 1];
        return s.Release();
    }
    if (m != n) return NotSquareErr;
    const size_t nn = static_cast<size_t>(n) * n;
    Scratch<T> lu;
    Scratch<int32_t> perm;
    if (lu.Allocate(nn) != 0 || perm.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    std::memcpy(lu.get(), a, nn * sizeof(T));
    int32_t parity = 0;
    Status s = LuFactorSquare(lu.get(), n, perm.get(), &parity);
    if (s == SingularPivotWarn) {
        *cond = std::numeric_limits<double>::infinity();
        return MergeRelease(MergeRelease(0, lu.Release()), perm.Release());
    }
    double normA = 0, normInv = 0;
    if (s == 0) s = LuInverse(lu.get(), perm.get(), n, lu.get());
    if (s == 0) s = NormOf(a, m, n, type, &normA);
    if (s == 0) s = NormOf(lu.get(), n, n, type, &normInv);
    if (s == 0) *cond = normA * normInv;
    return MergeRelease(MergeRelease(s, lu.Release()), perm.Release());
}

template <class T>
Status VectorNorm(T* x, int32_t n, double p, int32_t normalise, double* result) {
    *result = kNaN;
    if (std::isnan(p)) return NanInfErr;
    if (p == 0) return DegenerateDataErr;
    double norm = 0;
    if (std::isinf(p)) {
        norm = Magnitude(x[0]);
        for (int32_t i = 1; i < n; ++i)
            norm = p > 0 ? std::max(norm, Magnitude(x[i])) : std::min(norm, Magnitude(x[i]));
    } else if (p == 1) {
        for (int32_t i = 0; i < n; ++i) norm += Magnitude(x[i]);
    } else if (p == 2) {
        for (int32_t i = 0; i < n; ++i) norm += Abs2(x[i]);
        norm = std::sqrt(norm);
    } else {
        // |z|^p of a complex element is (re^2 + im^2)^(p/2); of a real one |x|^p.
        for (int32_t i = 0; i < n; ++i)
            norm += kIsComplex<T> ? std::pow(Abs2(x[i]), p / 2) : std::pow(Magnitude(x[i]), p);
        norm = std::pow(norm, 1 / p);
    }
    if (normalise != 0 && norm != 0) {
        const double scale = 1 / norm;
        for (int32_t i = 0; i < n; ++i) x[i] *= scale;
    }
    *result = norm;
    return 0;
}

#define TW_MATRIX_CORE(T)                                                                            \
    template Status TransposeMatrix<T, false>(T*, int32_t, int32_t, T*);                            \
    template Status MatMul<T>(const T*, const T*, int32_t, int32_t, int32_t, T*, int32_t);          \
    template void AxVect<T>(const T*, int32_t, int32_t, const T*, T*);                              \
    template Status SingularValues<T>(const T*, int32_t, int32_t, double*);                         \
    template Status MatrixNorm<T>(const T*, int32_t, int32_t, int32_t, double*);                    \
    template Status MatrixRank<T>(const T*, int32_t, int32_t, double, int32_t*);                    \
    template Status ConditionNumber<T>(const T*, int32_t, int32_t, int32_t, double*);               \
    template Status VectorNorm<T>(T*, int32_t, double, int32_t, double*);
TW_MATRIX_CORE(double)
TW_MATRIX_CORE(cdouble)
#undef TW_MATRIX_CORE
template Status TransposeMatrix<cdouble, true>(cdouble*, int32_t, int32_t, cdouble*);

}  // namespace tw
