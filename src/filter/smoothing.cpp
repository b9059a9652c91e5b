// Savitzky-Golay design through the QR of the weighted Vandermonde matrix, the smoothing pass, and
// the sliding-window running median.
#include "filter/smoothing.hpp"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "matrix/decompose.hpp"
#include "numeric/sort.hpp"

namespace tw {

namespace {

size_t Cells(int32_t rows, int32_t cols) { return static_cast<size_t>(rows) * static_cast<size_t>(cols); }

// The inverse of the upper triangular c by c r into inv, column by column from the diagonal up.
void InvertUpper(const double* r, int32_t c, double* inv) {
    std::fill(inv, inv + Cells(c, c), 0.0);
    for (int32_t j = 0; j < c; ++j) {
        inv[Cells(j, c) + j] = 1 / r[Cells(j, c) + j];
        for (int32_t i = j - 1; i >= 0; --i) {
            double sum = 0;
            for (int32_t k = i + 1; k <= j; ++k) sum += r[Cells(i, c) + k] * inv[Cells(k, c) + j];
            inv[Cells(i, c) + j] = -sum / r[Cells(i, c) + i];
        }
    }
}

// NaN sorts first, as SortAscending puts it.
inline bool Before(double a, double b) { return a < b || (std::isnan(a) && !std::isnan(b)); }
inline bool Same(double a, double b) { return a == b || (std::isnan(a) && std::isnan(b)); }

inline double Middle(const double* s, int64_t w) {
    return w % 2 != 0 ? s[w / 2] : (s[w / 2 - 1] + s[w / 2]) * 0.5;
}

}  // namespace

Status SavitzkyGolayArguments(int32_t order, int32_t frame, int32_t weightCount, int32_t n) {
    if (order < 1) return TermsBelowOneErr;
    if (frame <= order) return PolyOrderErr;
    if (frame % 2 == 0) return EvenTapsErr;
    if (weightCount != 0 && weightCount != frame) return EqSamplesErr;
    if (n >= 0 && n < frame) return SizeMismatchErr;
    return 0;
}

Status SavitzkyGolayDesign(int32_t order, int32_t frame, const double* weights, double* h, double* k) {
    const int32_t c = order + 1, f = frame, half = (frame - 1) / 2;
    // Fewer non-zero weights than coefficients leave R with a zero on its diagonal in exact
    // arithmetic, whatever the rounding makes of it.
    if (weights != nullptr && std::count_if(weights, weights + f, [](double w) { return w != 0; }) < c)
        return SingularMatrixErr;
    Scratch<double> work;
    const size_t fc = Cells(f, c), cc = Cells(c, c);
    if (work.Allocate(2 * fc + 3 * cc + (k == nullptr ? fc : 0)) != 0) return OutOfMemoryErr;
    double* a = work.get();
    double* scaled = a + fc;
    double* r = scaled + fc;
    double* inv = r + cc;
    double* g = inv + cc;
    double* kk = k != nullptr ? k : g + cc;
    for (int32_t i = 0; i < f; ++i) {
        const double t = i - half;
        double power = 1;
        for (int32_t j = 0; j < c; ++j, power *= t) a[Cells(i, c) + static_cast<size_t>(j)] = power;
    }
    std::memcpy(scaled, a, fc * sizeof(double));
    if (weights != nullptr)
        for (int32_t i = 0; i < f; ++i) {
            const double root = std::sqrt(std::fabs(weights[i]));
            for (int32_t j = 0; j < c; ++j) scaled[Cells(i, c) + static_cast<size_t>(j)] *= root;
        }
    // Non-finite weights, or powers of the abscissa beyond the double range.
    Status s = std::all_of(scaled, scaled + fc, [](double v) { return std::isfinite(v); }) ? 0 : NanInfErr;
    if (s == 0) s = QrHouseholder<double>(scaled, f, c, 1, nullptr, r);
    for (int32_t i = 0; s == 0 && i < c; ++i)
        if (r[Cells(i, c) + static_cast<size_t>(i)] == 0) s = SingularMatrixErr;
    if (s != 0) return MergeRelease(s, work.Release());

    InvertUpper(r, c, inv);
    // G = R^-1 R^-T = (A^T D A)^-1; both factors are upper triangular.
    for (int32_t i = 0; i < c; ++i)
        for (int32_t j = 0; j < c; ++j) {
            double sum = 0;
            for (int32_t m = std::max(i, j); m < c; ++m) sum += inv[Cells(i, c) + m] * inv[Cells(j, c) + m];
            g[Cells(i, c) + j] = sum;
        }
    for (int32_t i = 0; i < c; ++i)
        for (int32_t j = 0; j < f; ++j) {
            double sum = 0;
            for (int32_t m = 0; m < c; ++m) sum += g[Cells(i, c) + m] * a[Cells(j, c) + m];
            kk[Cells(i, f) + j] = weights != nullptr ? sum * std::fabs(weights[j]) : sum;
        }
    for (int32_t i = 0; i < f; ++i) {
        double* row = h + Cells(i, f);
        std::fill(row, row + f, 0.0);
        for (int32_t m = 0; m < c; ++m) {
            const double am = a[Cells(i, c) + m];
            const double* km = kk + Cells(m, f);
            for (int32_t j = 0; j < f; ++j) row[j] += am * km[j];
        }
    }
    return work.Release();
}

void SavitzkyGolaySmooth(const double* x, int32_t n, const double* h, int32_t frame, double* y) {
    const int32_t half = (frame - 1) / 2;
    const auto dot = [frame](const double* row, const double* v) {
        double sum = 0;
        for (int32_t j = 0; j < frame; ++j) sum += row[j] * v[j];
        return sum;
    };
    for (int32_t i = 0; i < half; ++i) y[i] = dot(h + Cells(i, frame), x);
    const double* centre = h + Cells(half, frame);
    const int32_t inside = n - frame + 1;
    // Eight outputs at a time, each still summed in the order of the plain dot product, so that
    // the compiler can vectorise across outputs without changing a bit.
    constexpr int32_t kLanes = 8;
    int32_t i = 0;
    for (; i + kLanes <= inside; i += kLanes) {
        double sum[kLanes] = {};
        for (int32_t j = 0; j < frame; ++j) {
            const double cj = centre[j];
            const double* v = x + i + j;
            for (int32_t l = 0; l < kLanes; ++l) sum[l] += cj * v[l];
        }
        std::memcpy(y + i + half, sum, sizeof sum);
    }
    for (; i < inside; ++i) y[i + half] = dot(centre, x + i);
    const double* last = x + (n - frame);
    for (int32_t i2 = half + 1; i2 < frame; ++i2) y[n - frame + i2] = dot(h + Cells(i2, frame), last);
}

Status MedianFilter(double* x, int32_t n, int32_t left, int32_t right) {
    if (n == 0 || (left == 0 && right == 0)) return 0;
    const int64_t w = int64_t{left} + 1 + right;
    // A window more than half of padding has a padding zero at its middle wherever it stands, and
    // this also bounds the work memory by the data.
    if (w > 2 * int64_t{n}) {
        std::fill(x, x + n, 0.0);
        return 0;
    }
    Scratch<double> work;
    if (work.Allocate(static_cast<size_t>(w + left)) != 0) return OutOfMemoryErr;
    double* s = work.get();
    double* ring = s + w;
    std::fill(s, s + left, 0.0);
    std::memcpy(s + left, x, (static_cast<size_t>(right) + 1) * sizeof(double));
    Status st = SortAscending(s, static_cast<int32_t>(w));
    std::fill(ring, ring + left, 0.0);
    int32_t slot = 0;
    for (int32_t i = 0; i < n; ++i) {
        const double current = x[i];
        x[i] = Middle(s, w);
        if (i + 1 == n) break;
        double leaving = current;
        if (left > 0) {
            leaving = ring[slot];
            ring[slot] = current;
            slot = slot + 1 == left ? 0 : slot + 1;
        }
        const double entering = int64_t{i} + 1 + right < n ? x[i + 1 + right] : 0.0;
        // Remove by leaving a hole where the leaving value stood, then move the hole to where the
        // entering value belongs, shifting the elements between by one.
        int64_t hole = 0;
        while (hole + 1 < w && !Same(s[hole], leaving)) ++hole;
        while (hole > 0 && Before(entering, s[hole - 1])) {
            s[hole] = s[hole - 1];
            --hole;
        }
        while (hole + 1 < w && Before(s[hole + 1], entering)) {
            s[hole] = s[hole + 1];
            ++hole;
        }
        s[hole] = entering;
    }
    return MergeRelease(st, work.Release());
}

}  // namespace tw
