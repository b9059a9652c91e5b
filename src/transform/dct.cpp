#include "transform/dct.hpp"

#include <algorithm>
#include <cmath>
#include <numbers>

namespace tw {
namespace {

// x[j] of a sequence that is zero beyond its count values.
struct Source {
    const double* x;
    int32_t count;
    ptrdiff_t stride;
    double operator()(int32_t j) const { return j < count ? x[j * stride] : 0.0; }
};

// X[k] of a real transform of length m from its half-complex packing h, for any k below m.
void HalfComplexAt(const double* h, int32_t m, int32_t k, double* re, double* im) {
    if (k == 0 || 2 * int64_t{k} == m) {
        *re = h[k];
        *im = 0;
    } else if (2 * int64_t{k} < m) {
        *re = h[k];
        *im = h[m - k];
    } else {
        *re = h[m - k];
        *im = -h[k];
    }
}

// f(k, cos, sin) of the angle pi k / (2n) for k from 0 below count. True values at every 32nd k,
// rotated by true small steps in between: a few ulp at any k, where a running recurrence would
// drift by about k eps.
template <class F>
void QuarterWavePhasors(int32_t n, int32_t count, F&& f) {
    constexpr int32_t kBlock = 32;
    const double step = std::numbers::pi / (2.0 * n);
    double fineCos[kBlock], fineSin[kBlock];
    for (int32_t l = 0; l < kBlock; ++l) {
        fineCos[l] = std::cos(l * step);
        fineSin[l] = std::sin(l * step);
    }
    for (int32_t k0 = 0; k0 < count; k0 += kBlock) {
        const double angle = std::numbers::pi * k0 / (2.0 * n);
        const double c0 = std::cos(angle), s0 = std::sin(angle);
        const int32_t end = std::min(kBlock, count - k0);
        for (int32_t l = 0; l < end; ++l)
            f(k0 + l, c0 * fineCos[l] - s0 * fineSin[l], s0 * fineCos[l] + c0 * fineSin[l]);
    }
}

// Makhoul's arrangement for even n on a table of length n; for odd n the symmetric extension of
// length 2n, which needs no reordering.
Status CosForward(const FftTable* t, Source x, double* y, ptrdiff_t os, int32_t n, double* work) {
    const bool even = n % 2 == 0;
    const int32_t m = even ? n : 2 * n;
    double* v = work;
    double* V = work + m;
    if (even) {
        for (int32_t j = 0; j < n / 2; ++j) {
            v[j] = x(2 * j);
            v[n - 1 - j] = x(2 * j + 1);
        }
    } else {
        for (int32_t j = 0; j < n; ++j) v[j] = v[2 * n - 1 - j] = x(j);
    }
    if (const Status s = FftRealForward(t, v, V, 1, 1, m)) return s;
    const double scale = 2 / std::sqrt(2.0 * n);
    const double root = std::sqrt(2.0 * n);
    QuarterWavePhasors(n, n, [&](int32_t k, double c, double s) {
        double re, im;
        HalfComplexAt(V, m, k, &re, &im);
        const double r = c * re + s * im;  // Re(exp(-i pi k / (2n)) V[k])
        y[k * os] = even ? r * scale : r / root;
    });
    y[0] = y[0] / std::sqrt(2.0);
    return 0;
}

// The weights w[k] = s[k] exp(i pi k / (2n)) undo the forward arrangement: through a complex
// inverse of length n for even n, through a Hermitian sequence of length 2n for odd n.
Status CosInverse(const FftTable* t, Source x, double* y, ptrdiff_t os, int32_t n, double* work) {
    const double s0 = std::sqrt(static_cast<double>(n)), sk = std::sqrt(2.0 * n);
    if (n % 2 == 0) {
        double* aRe = work;
        double* aIm = work + n;
        double* tRe = work + 2 * static_cast<ptrdiff_t>(n);
        double* tIm = work + 3 * static_cast<ptrdiff_t>(n);
        QuarterWavePhasors(n, n, [&](int32_t k, double c, double s) {
            const double weight = k == 0 ? s0 : sk;
            const double xk = x(k);
            aRe[k] = weight * c * xk;
            aIm[k] = weight * s * xk;
        });
        if (const Status s = FftComplexInverse(t, aRe, aIm, tRe, tIm, 1, 1, n)) return s;
        for (int32_t j = 0; j < n / 2; ++j) {
            y[2 * j * os] = tRe[j];
            y[(2 * j + 1) * os] = tRe[n - 1 - j];
        }
        return 0;
    }
    const int32_t m = 2 * n;
    double* h = work;
    double* out = work + m;
    QuarterWavePhasors(n, n, [&](int32_t k, double c, double s) {
        const double xk = x(k);
        if (k == 0) {
            h[0] = 2 * (s0 * xk);
        } else {
            h[k] = sk * c * xk;
            h[m - k] = sk * s * xk;
        }
    });
    h[n] = 0;
    if (const Status s = FftRealInverse(t, h, out, 1, 1, m)) return s;
    for (int32_t j = 0; j < n; ++j) y[j * os] = out[j];
    return 0;
}

// The odd extension of length 2n+2, whose transform is -2i times the sine sums.
template <bool Inverse>
Status SinTransform(const FftTable* t, Source x, double* y, ptrdiff_t os, int32_t n, double* work) {
    const int32_t m = 2 * n + 2;
    double* v = work;
    double* V = work + m;
    v[0] = 0;
    v[n + 1] = 0;
    for (int32_t j = 1; j <= n; ++j) {
        const double xj = x(j - 1);
        v[j] = xj;
        v[m - j] = -xj;
    }
    if (const Status s = FftRealForward(t, v, V, 1, 1, m)) return s;
    for (int32_t k = 1; k <= n; ++k) {
        const double im = V[m - k];
        y[(k - 1) * os] = Inverse ? -im / static_cast<double>(n + 1) : -0.5 * im;
    }
    return 0;
}

}  // namespace

int32_t TrigTableLength(TrigKind kind, int32_t n) {
    int64_t m = n;
    switch (kind) {
        case TrigKind::CosForward:
        case TrigKind::CosInverse:
            m = n % 2 == 0 ? n : 2 * m;
            break;
        case TrigKind::SinForward:
        case TrigKind::SinInverse:
            m = 2 * m + 2;
            break;
    }
    return m > INT32_MAX ? 0 : static_cast<int32_t>(m);
}

size_t TrigWorkLength(TrigKind kind, int32_t n) {
    const size_t m = static_cast<size_t>(n);
    switch (kind) {
        case TrigKind::CosForward:
            return n % 2 == 0 ? 2 * m : 4 * m;
        case TrigKind::CosInverse:
            return 4 * m;
        case TrigKind::SinForward:
        case TrigKind::SinInverse:
            break;
    }
    return 4 * (m + 1);
}

Status TrigTransformStrided(TrigKind kind, const FftTable* table, const double* x, int32_t count,
                            ptrdiff_t inStride, double* y, ptrdiff_t outStride, int32_t n, double* work) {
    const Source source{x, count, inStride};
    switch (kind) {
        case TrigKind::CosForward:
            return CosForward(table, source, y, outStride, n, work);
        case TrigKind::CosInverse:
            return CosInverse(table, source, y, outStride, n, work);
        case TrigKind::SinForward:
            return SinTransform<false>(table, source, y, outStride, n, work);
        case TrigKind::SinInverse:
            return SinTransform<true>(table, source, y, outStride, n, work);
    }
    return InternalErr;
}

Status TrigTransform(TrigKind kind, const FftTable* table, const double* x, int32_t count, double* y,
                     int32_t n) {
    Scratch<double> work;
    Status s = work.Allocate(TrigWorkLength(kind, n));
    if (s == 0) s = TrigTransformStrided(kind, table, x, count, 1, y, 1, n, work.get());
    return MergeRelease(s, work.Release());
}

Status TrigTransform2D(TrigKind kind, const FftTable* rowTable, const FftTable* colTable, const double* x,
                       int32_t xRows, int32_t xCols, double* y, int32_t rows, int32_t cols) {
    Scratch<double> work;
    Status s = work.Allocate(std::max(TrigWorkLength(kind, rows), TrigWorkLength(kind, cols)));
    const ptrdiff_t stride = cols;
    for (int32_t r = 0; s == 0 && r < rows; ++r) {
        double* row = y + r * stride;
        if (r < xRows)
            s = TrigTransformStrided(kind, rowTable, x + r * ptrdiff_t{xCols}, xCols, 1, row, 1, cols,
                                     work.get());
        else
            std::fill(row, row + cols, 0.0);
    }
    for (int32_t c = 0; s == 0 && c < cols; ++c)
        s = TrigTransformStrided(kind, colTable, y + c, rows, stride, y + c, stride, rows, work.get());
    return MergeRelease(s, work.Release());
}

}  // namespace tw
