// Schur forms and the generalised Schur form through LAPACK on transposing copies, with the
// library's own ordering layer: keys per eigenvalue and a bubble sort of diagonal blocks.
#include <algorithm>
#include <cmath>
#include <cstring>

#include "matrix/decompose.hpp"
#include "matrix/eigen.hpp"

namespace tw {

thread_local bool gFailQzExchange = false;

namespace {

inline size_t Square(int32_t n) { return static_cast<size_t>(n) * static_cast<size_t>(n); }

// Marks of a real quasi-triangular form: a real eigenvalue, the first or the second of a pair.
enum Mark : int8_t { kSecond = 0, kReal = 1, kFirst = 2 };

// One pass structure shared by both bubble sorts: blocks start where the mark is not kSecond
// (all of them in the complex case). before(p, c) says the block at c must go in front of the
// block at p; exchange(p, c) moves it there and returns a status (1: not moved, no failure).
// Passes run from the end to the front until none exchanges.
template <class Before, class Exchange>
Status BubbleBlocks(int32_t n, const int8_t* marks, Before before, Exchange exchange) {
    const auto size = [&](int32_t start) { return (start + 1 < n && marks[start + 1] == kSecond) ? 2 : 1; };
    const auto startOf = [&](int32_t last) { return marks[last] == kSecond ? last - 1 : last; };
    for (int32_t pass = 0; pass <= n; ++pass) {
        bool changed = false;
        int32_t i = n - 1;
        while (i > 0) {
            const int32_t c = startOf(i);
            if (c <= 0) break;
            const int32_t p = startOf(c - 1);
            const int32_t sp = size(p), sc = size(c);
            if (before(p, c)) {
                const Status s = exchange(p, c);
                if (s < 0) return s;
                if (s == 0) {
                    changed = true;
                    i = p + sc - 1;
                    continue;
                }
            }
            i = p + sp - 1;
        }
        if (!changed) break;
    }
    return 0;
}

// Moves the block [c, c + sc) in front of [p, c) in every per-position array.
template <class V>
void Rotate(V* v, int32_t p, int32_t c, int32_t sc) {
    std::rotate(v + p, v + c, v + c + sc);
}

template <class T>
Status TransposeOut(T* src, int32_t n, T* dst) {
    return dst == nullptr ? 0 : TransposeMatrix<T>(src, n, n, dst);
}

}  // namespace

Status SchurDecomp(const double* a, int32_t n, uint32_t order, DgeesSelect select, int32_t* sdim, double* q,
                   double* t, cdouble* values) {
    if (order > 4) return InvalidSelectorErr;
    if (n < 1) return EmptyArrayErr;
    if (HasNonFinite(a, n * n)) return NanInfErr;
    const size_t nn = Square(n);
    Scratch<double> work;
    Scratch<int8_t> markBlock;
    if (work.Allocate(2 * nn + 3 * static_cast<size_t>(n)) != 0 || markBlock.Allocate(static_cast<size_t>(n)) != 0)
        return OutOfMemoryErr;
    double* ct = work.get();
    double* cq = q != nullptr ? ct + nn : nullptr;
    double* wr = ct + 2 * nn;
    double* wi = wr + n;
    double* key = wi + n;
    int8_t* marks = markBlock.get();
    Status s = TransposeMatrix<double>(const_cast<double*>(a), n, n, ct);
    int dim = 0;
    if (s == 0) s = Gees(n, ct, select, &dim, wr, wi, cq);
    if (s == 0 && order > 0) {
        const bool magnitude = order >= 3;
        const auto T = [&](int32_t i, int32_t j) -> double& { return ct[static_cast<size_t>(j) * n + i]; };
        double sum = 0;
        for (int32_t i = 0; i < n; ++i) sum += std::fabs(wr[i]) + std::fabs(wi[i]);
        for (int32_t i = 0; i < n; ++i) {
            if (wi[i] == 0) {
                marks[i] = kReal;
                key[i] = magnitude ? Lapy2(wr[i], wi[i]) : wr[i];
                continue;
            }
            // A pair whose imaginary part is negligible against its real part and the whole
            // spectrum is split into two real eigenvalues.
            const bool genuine = wr[i] == 0 || std::fabs(wi[i] / wr[i]) > n * kEps || std::fabs(wi[i]) > sum * kEps;
            if (genuine) {
                marks[i] = kFirst;
                marks[i + 1] = kSecond;
                key[i] = key[i + 1] = magnitude ? Lapy2(wr[i], wi[i]) : wr[i];
            } else {
                // The larger off-diagonal goes above the diagonal first, by the exact rotation
                // [[0, 1], [-1, 0]], so that dropping the smaller keeps A = Q T Q^T.
                if (std::fabs(T(i + 1, i)) > std::fabs(T(i, i + 1))) {
                    for (int32_t j = 0; j < n; ++j) {
                        const double r0 = T(i, j), r1 = T(i + 1, j);
                        T(i, j) = r1;
                        T(i + 1, j) = -r0;
                    }
                    for (int32_t j = 0; j < n; ++j) {
                        const double c0 = T(j, i), c1 = T(j, i + 1);
                        T(j, i) = c1;
                        T(j, i + 1) = -c0;
                    }
                    if (cq != nullptr)
                        for (int32_t j = 0; j < n; ++j) {
                            double* c0 = cq + static_cast<size_t>(i) * n;
                            double* c1 = c0 + n;
                            const double x = c0[j];
                            c0[j] = c1[j];
                            c1[j] = -x;
                        }
                }
                T(i + 1, i) = 0;
                wi[i] = wi[i + 1] = 0;
                marks[i] = marks[i + 1] = kReal;
                key[i] = key[i + 1] = magnitude ? std::fabs(wr[i]) : wr[i];
            }
            ++i;
        }
        const bool ascending = order == 1 || order == 3;
        s = BubbleBlocks(
            n, marks,
            [&](int32_t p, int32_t c) { return ascending ? key[c] < key[p] : key[c] > key[p]; },
            [&](int32_t p, int32_t c) -> Status {
                int ilst = p + 1;
                const int info = Trexc(n, ct, cq, c + 1, &ilst);
                if (info < 0) return InternalErr;
                if (info > 0) return 1;
                const int32_t sc = marks[c] == kFirst ? 2 : 1;
                Rotate(key, p, c, sc);
                Rotate(wr, p, c, sc);
                Rotate(wi, p, c, sc);
                Rotate(marks, p, c, sc);
                return 0;
            });
    }
    if (s == 0) s = TransposeMatrix<double>(ct, n, n, t);
    if (s == 0) s = TransposeOut(cq, n, q);
    if (s == 0) {
        for (int32_t i = 0; i < n; ++i) values[i] = cdouble(wr[i], wi[i]);
        if (sdim != nullptr) *sdim = dim;
    }
    return MergeRelease(MergeRelease(s, work.Release()), markBlock.Release());
}

Status CxSchurDecomp(const cdouble* a, int32_t n, uint32_t order, ZgeesSelect select, int32_t* sdim, cdouble* q,
                     cdouble* t, cdouble* values) {
    if (order > 4) return InvalidSelectorErr;
    if (n < 1) return EmptyArrayErr;
    if (CxHasNonFinite(a, n * n)) return NanInfErr;
    const size_t nn = Square(n);
    Scratch<cdouble> work;
    Scratch<double> keyBlock;
    Scratch<int8_t> markBlock;
    if (work.Allocate(2 * nn + static_cast<size_t>(n)) != 0 || keyBlock.Allocate(static_cast<size_t>(n)) != 0 ||
        markBlock.Allocate(static_cast<size_t>(n)) != 0)
        return OutOfMemoryErr;
    cdouble* ct = work.get();
    cdouble* cq = q != nullptr ? ct + nn : nullptr;
    cdouble* w = ct + 2 * nn;
    double* key = keyBlock.get();
    int8_t* marks = markBlock.get();
    Status s = TransposeMatrix<cdouble>(const_cast<cdouble*>(a), n, n, ct);
    int dim = 0;
    if (s == 0) s = Gees(n, ct, select, &dim, w, cq);
    if (s == 0 && order > 0) {
        const bool ascending = order == 1 || order == 3;
        for (int32_t i = 0; i < n; ++i) {
            marks[i] = kReal;
            key[i] = order >= 3 ? Lapy2(w[i].real(), w[i].imag()) : w[i].real();
        }
        s = BubbleBlocks(
            n, marks,
            [&](int32_t p, int32_t c) { return ascending ? key[c] < key[p] : key[c] > key[p]; },
            [&](int32_t p, int32_t c) -> Status {
                int ilst = p + 1;
                const int info = Trexc(n, ct, cq, c + 1, &ilst);
                if (info < 0) return InternalErr;
                if (info > 0) return 1;
                Rotate(key, p, c, 1);
                Rotate(w, p, c, 1);
                return 0;
            });
    }
    if (s == 0) s = TransposeMatrix<cdouble>(ct, n, n, t);
    if (s == 0) s = TransposeOut(cq, n, q);
    if (s == 0) {
        std::copy(w, w + n, values);
        if (sdim != nullptr) *sdim = dim;
    }
    return MergeRelease(MergeRelease(MergeRelease(s, work.Release()), keyBlock.Release()), markBlock.Release());
}

namespace {

void QTimesA(const double* q, const double* a, int32_t n, double* c) {
    // Column-major Q^T times the row-major A, read column-major as A^T and transposed back.
    cblas_dgemm(CblasColMajor, CblasTrans, CblasTrans, n, n, n, 1.0, q, n, a, n, 0.0, c, n);
}
void QTimesA(const cdouble* q, const cdouble* a, int32_t n, cdouble* c) {
    const cdouble one = 1.0, zero = 0.0;
    cblas_zgemm(CblasColMajor, CblasConjTrans, CblasTrans, n, n, n, &one, q, n, a, n, &zero, c, n);
}

// Eigenvalues after the QZ iteration: alpha (complex) and beta in the element type.
Status RunHgeqz(int32_t n, double* h, double* t, double* q, double* z, double* ar, double* ai, double* beta,
                cdouble*) {
    return Hgeqz(n, h, t, ar, ai, beta, q, z);
}
Status RunHgeqz(int32_t n, cdouble* h, cdouble* t, cdouble* q, cdouble* z, double*, double*, cdouble* beta,
                cdouble* alpha) {
    return Hgeqz(n, h, t, alpha, beta, q, z);
}

}  // namespace

template <class T>
Status GeneralisedSchur(const T* a, const T* b, int32_t n, int32_t rowMajorQ, int32_t mode, int32_t order,
                        int32_t useDriver, T* s, T* t, T* q, T* z, cdouble* alpha, T* beta, T* right, T* left) {
    if (order < 0 || order > 4) return InvalidSelectorErr;
    if (n < 1) return EmptyArrayErr;
    if (Screen(a, n * n) || Screen(b, n * n)) return NanInfErr;
    const size_t nn = Square(n);
    Scratch<T> work;
    Scratch<double> realWork;
    Scratch<cdouble> alphaWork;
    Scratch<int8_t> markBlock;
    // Column-major S, T, Q, Z, vector blocks, beta.
    if (work.Allocate(6 * nn + static_cast<size_t>(n)) != 0 || realWork.Allocate(3 * static_cast<size_t>(n)) != 0 ||
        alphaWork.Allocate(static_cast<size_t>(n)) != 0 || markBlock.Allocate(static_cast<size_t>(n)) != 0)
        return OutOfMemoryErr;
    T* cs = work.get();
    T* ct = cs + nn;
    T* cq = ct + nn;
    T* cz = cq + nn;
    T* vl = cz + nn;
    T* vr = vl + nn;
    T* bt = vr + nn;
    double* ar = realWork.get();
    double* ai = ar + n;
    double* key = ai + n;
    cdouble* al = alphaWork.get();
    int8_t* marks = markBlock.get();
    const auto writeForm = [&]() -> Status {
        Status st = s != nullptr ? TransposeMatrix<T>(cs, n, n, s) : 0;
        if (st == 0 && t != nullptr) st = TransposeMatrix<T>(ct, n, n, t);
        if (st == 0 && q != nullptr) {
            if (rowMajorQ != 0)
                st = TransposeMatrix<T>(cq, n, n, q);
            else
                std::memcpy(static_cast<void*>(q), cq, nn * sizeof(T));
        }
        if (st == 0 && z != nullptr) st = TransposeMatrix<T>(cz, n, n, z);
        return st;
    };
    const auto twice = [&]() -> Status {
        Status st = RunHgeqz(n, cs, ct, cq, cz, ar, ai, bt, al);
        if (st == 0) st = RunHgeqz(n, cs, ct, cq, cz, ar, ai, bt, al);
        return st;
    };
    Status st = 0;
    if (useDriver != 0 && mode != 0) {
        st = TransposeMatrix<T>(const_cast<T*>(a), n, n, cs);
        if (st == 0) st = TransposeMatrix<T>(const_cast<T*>(b), n, n, ct);
        if (st == 0) {
            if constexpr (kIsComplex<T>)
                st = Gges(n, cs, ct, al, bt, cq, cz);
            else
                st = Gges(n, cs, ct, ar, ai, bt, cq, cz);
        }
    } else {
        // B = Q R; A' = Q^T A; then the Hessenberg-triangular form and the QZ iteration.
        st = QrHouseholder<T>(b, n, n, 0, vl, vr);
        if (st == 0) st = TransposeMatrix<T>(vl, n, n, cq);
        if (st == 0) st = TransposeMatrix<T>(vr, n, n, ct);
        if (st == 0) QTimesA(cq, a, n, cs);
        if (st == 0) st = Gghrd(n, cs, ct, cq, cz);
        if (st == 0 && mode == 0) st = writeForm();
        if (st == 0) st = twice();
    }
    if constexpr (kIsComplex<T>) {
        for (int32_t i = 0; st == 0 && i < n; ++i) {
            ar[i] = al[i].real();
            ai[i] = al[i].imag();
        }
    }
    Status warn = 0;
    if (st == 0 && mode != 0 && order > 0) {
        const auto betaOf = [&](int32_t i) -> double {
            if constexpr (kIsComplex<T>)
                return bt[i].real();
            else
                return bt[i];
        };
        for (int32_t i = 0; i < n; ++i)
            if (ar[i] == 0 && ai[i] == 0 && betaOf(i) == 0) warn = UndefinedEigenvalueWarn;
        if (warn == 0) {
            for (int32_t i = 0; i < n; ++i) {
                marks[i] = kIsComplex<T> ? kReal : ai[i] > 0 ? kFirst : ai[i] < 0 ? kSecond : kReal;
                key[i] = order >= 3 ? Lapy2(ar[i], ai[i]) : ar[i];
                if (marks[i] == kSecond) key[i] = key[i - 1];
            }
            const bool ascending = order == 1 || order == 3;
            // Keys compared as key / beta, by cross multiplication; an infinite eigenvalue (beta
            // 0, key not 0) goes to the far end of the order.
            const auto before = [&](int32_t p, int32_t c) {
                const double k1 = key[p], k2 = key[c], b1 = betaOf(p), b2 = betaOf(c);
                const double bb = b1 * b2;
                if (bb == 0) return ascending ? (b1 == 0 && k1 != 0) : (b2 == 0 && k2 != 0);
                const double x = k1 * b2, y = k2 * b1;
                return ascending ? ((x > y && bb > 0) || (x < y && bb < 0)) : ((x < y && bb > 0) || (x > y && bb < 0));
            };
            st = BubbleBlocks(n, marks, before, [&](int32_t p, int32_t c) -> Status {
                int ifst = c + 1, ilst = p + 1;
                int info = Tgexc(n, cs, ct, cq, cz, &ifst, &ilst);
                if (gFailQzExchange) {
                    gFailQzExchange = false;
                    info = 1;
                }
                if (info < 0) return InternalErr;
                if (info == 1) return FactorisationFailedErr;
                const int32_t sc = marks[c] == kFirst ? 2 : 1;
                Rotate(key, p, c, sc);
                Rotate(ar, p, c, sc);
                Rotate(ai, p, c, sc);
                Rotate(bt, p, c, sc);
                Rotate(marks, p, c, sc);
                return 0;
            });
            if (st == 0) st = twice();
            if constexpr (kIsComplex<T>) {
                for (int32_t i = 0; st == 0 && i < n; ++i) {
                    ar[i] = al[i].real();
                    ai[i] = al[i].imag();
                }
            }
        }
    }
    if (st == 0 && mode != 0) st = writeForm();
    if (st == 0) {
        for (int32_t i = 0; i < n; ++i) alpha[i] = cdouble(ar[i], ai[i]);
        if (beta != nullptr) std::copy(bt, bt + n, beta);
    }
    if (st == 0 && (right != nullptr || left != nullptr)) {
        const char side = right != nullptr && left != nullptr ? 'B' : right != nullptr ? 'R' : 'L';
        std::memcpy(static_cast<void*>(vl), cq, nn * sizeof(T));
        std::memcpy(static_cast<void*>(vr), cz, nn * sizeof(T));
        st = Tgevc(side, n, cs, ct, vl, vr);
        if (st == 0 && right != nullptr) st = TransposeMatrix<T>(vr, n, n, right);
        if (st == 0 && left != nullptr) st = TransposeMatrix<T>(vl, n, n, left);
    }
    if (st == 0) st = warn;
    st = MergeRelease(MergeRelease(st, work.Release()), realWork.Release());
    return MergeRelease(MergeRelease(st, alphaWork.Release()), markBlock.Release());
}

template Status GeneralisedSchur<double>(const double*, const double*, int32_t, int32_t, int32_t, int32_t, int32_t,
                                         double*, double*, double*, double*, cdouble*, double*, double*, double*);
template Status GeneralisedSchur<cdouble>(const cdouble*, const cdouble*, int32_t, int32_t, int32_t, int32_t, int32_t,
                                          cdouble*, cdouble*, cdouble*, cdouble*, cdouble*, cdouble*, cdouble*,
                                          cdouble*);

}  // namespace tw
