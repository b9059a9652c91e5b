// Least-squares B-spline approximation of a curve in c dimensions: parameter values, averaged
// clamped knots, Cox-de Boor basis rows and the normal equations solved by Cholesky.
#include <algorithm>
#include <cmath>
#include <cstring>

#include "fit/spline.hpp"
#include "matrix/solve.hpp"

namespace tw {

namespace {

// Distance between rows i - 1 and i of the n by c data.
double Distance(const double* data, int32_t c, int32_t i) {
    const double* a = data + static_cast<size_t>(i - 1) * c;
    const double* b = a + c;
    if (c == 1) return std::fabs(b[0] - a[0]);
    double sum = 0;
    for (int32_t k = 0; k < c; ++k) sum += (b[k] - a[k]) * (b[k] - a[k]);
    return std::sqrt(sum);
}

void Uniform(int32_t n, double* u) {
    for (int32_t i = 0; i < n; ++i) u[i] = static_cast<double>(i) / (n - 1);
}

// Parameter values from the caller's t, or by the chosen parameterisation; first 0, last 1.
Status Parameters(const double* data, int32_t n, int32_t c, const double* t, uint32_t kind, double* u) {
    if (t != nullptr) {
        for (int32_t i = 1; i < n; ++i)
            if (t[i] < t[i - 1]) return NotAscendingErr;
        for (int32_t i = 0; i < n; ++i)
            if (!std::isfinite(t[i])) return NanInfErr;
        const double span = t[n - 1] - t[0];
        const bool usable = span > 0 && std::isfinite(span);
        for (int32_t i = 0; i < n; ++i) u[i] = usable ? (t[i] - t[0]) / span : t[i] - t[n - 1];
        return 0;
    }
    if (kind == 0) {
        Uniform(n, u);
        return 0;
    }
    u[0] = 0;
    for (int32_t i = 1; i < n; ++i) {
        const double dist = Distance(data, c, i);
        u[i] = u[i - 1] + (kind == 2 ? std::sqrt(dist) : dist);
    }
    const double total = u[n - 1];
    if (!(total > 0)) {  // every point the same: no length to share out
        Uniform(n, u);
        return 0;
    }
    for (int32_t i = 1; i < n; ++i) u[i] = std::min(u[i] / total, 1.0);
    u[n - 1] = 1;
    return 0;
}

// m + d + 1 clamped knots; the interior ones average the parameter values they fall between.
void Knots(const double* u, int32_t n, int32_t d, int32_t m, double* knot) {
    const int32_t top = m - 1;
    std::fill(knot, knot + d + 1, 0.0);
    const double step = static_cast<double>(n) / (top - d + 1);
    for (int32_t j = 1; j <= top - d; ++j) {
        const int32_t i = static_cast<int32_t>(j * step);
        const double a = j * step - i;
        knot[d + j] = (1 - a) * u[i - 1] + a * u[i];
    }
    std::fill(knot + top + 1, knot + top + d + 2, 1.0);
}

// The knot span holding v: knot[span] <= v < knot[span + 1], the last span for v at the end.
int32_t Span(const double* knot, int32_t d, int32_t top, double v) {
    if (v >= knot[top + 1]) return top;
    int32_t low = d, high = top + 1;
    int32_t mid = (low + high) / 2;
    while ((v < knot[mid] || v >= knot[mid + 1]) && high - low > 1) {
        if (v < knot[mid])
            high = mid;
        else
            low = mid;
        mid = (low + high) / 2;
    }
    return mid;
}

// The d + 1 basis functions that do not vanish on the span (Cox-de Boor triangle).
void Basis(const double* knot, int32_t span, double v, int32_t d, double* left, double* right, double* out) {
    out[0] = 1;
    for (int32_t j = 1; j <= d; ++j) {
        left[j] = v - knot[span + 1 - j];
        right[j] = knot[span + j] - v;
        double saved = 0;
        for (int32_t r = 0; r < j; ++r) {
            const double temp = out[r] / (right[r + 1] + left[j - r]);
            out[r] = saved + right[r + 1] * temp;
            saved = left[j - r] * temp;
        }
        out[j] = saved;
    }
}

}  // namespace

Status BSplineFitCore(double* data, int32_t n, int32_t c, const double* w, const double* t, int32_t degree,
                      int32_t m, uint32_t parameterisation, double* control, double* mse) {
    if (n < 2) return TooFewSamples2Err;
    if (degree < 1) return OrderNotPositiveErr;
    if (m > n || m <= degree) return PolyOrderErr;
    if (parameterisation > 2) return InvalidSelectorErr;
    if (w != nullptr)
        for (int32_t i = 0; i < n; ++i)
            if (w[i] == 0) return DegenerateDataErr;
    const size_t nn = static_cast<size_t>(n), mm = static_cast<size_t>(m), cc = static_cast<size_t>(c),
                 dd = static_cast<size_t>(degree) + 1;
    // Sizes beyond any memory are refused before the byte counts could overflow.
    if (8.0 * (static_cast<double>(nn) * static_cast<double>(dd) +
               static_cast<double>(mm) * static_cast<double>(mm)) >
        0x1p60)
        return OutOfMemoryErr;
    Scratch<double> block, gram;
    Scratch<int32_t> spans;
    if (block.Allocate(nn + mm + dd + nn * dd + 2 * dd + mm * cc + cc) != 0 || gram.Allocate(mm * mm) != 0 ||
        spans.Allocate(nn) != 0)
        return OutOfMemoryErr;
    double* u = block.get();
    double* knot = u + nn;
    double* rows = knot + mm + dd;
    double* left = rows + nn * dd;
    double* right = left + dd;
    double* rhs = right + dd;
    double* fit = rhs + mm * cc;
    double* g = gram.get();
    Status s = Parameters(data, n, c, t, parameterisation, u);
    if (s == 0) {
        Knots(u, n, degree, m, knot);
        std::fill(g, g + mm * mm, 0.0);
        std::fill(rhs, rhs + mm * cc, 0.0);
        // Normal equations: the upper triangle of N^T W N and N^T W data.
        for (size_t i = 0; i < nn; ++i) {
            const int32_t span = Span(knot, degree, m - 1, u[i]);
            spans[i] = span;
            double* b = rows + i * dd;
            Basis(knot, span, u[i], degree, left, right, b);
            const double wi = w != nullptr ? std::fabs(w[i]) : 1.0;
            const size_t first = static_cast<size_t>(span - degree);
            const double* p = data + i * cc;
            for (size_t r = 0; r < dd; ++r) {
                const double wb = w != nullptr ? wi * b[r] : b[r];
                double* grow = g + (first + r) * mm + first;
                for (size_t q = r; q < dd; ++q) grow[q] += wb * b[q];
                double* hrow = rhs + (first + r) * cc;
                for (size_t k = 0; k < cc; ++k) hrow[k] += wb * p[k];
            }
        }
        s = SolveByCholesky(g, m, 1, rhs, c, control);
    }
    if (s == 0) {
        double sum = 0;
        for (size_t i = 0; i < nn; ++i) {
            const double* b = rows + i * dd;
            const double* cp = control + static_cast<size_t>(spans[i] - degree) * cc;
            double* p = data + i * cc;
            double term = 0;
            for (size_t k = 0; k < cc; ++k) {
                double f = 0;
                for (size_t r = 0; r < dd; ++r) f += b[r] * cp[r * cc + k];
                fit[k] = f;
                term += f * f + (p[k] - 2 * f) * p[k];
            }
            sum += w != nullptr ? term * std::fabs(w[i]) : term;
            std::memcpy(p, fit, cc * sizeof(double));
        }
        *mse = (1.0 / n) * sum;
    }
    return MergeRelease(MergeRelease(MergeRelease(s, block.Release()), gram.Release()), spans.Release());
}

}  // namespace tw
