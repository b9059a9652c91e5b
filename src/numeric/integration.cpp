#include "numeric/integration.hpp"

#include <cmath>

namespace tw {
namespace {

// Panel width in intervals of methods 1 to 3.
constexpr int32_t kWidth[4] = {0, 2, 3, 4};

// The main rule over `panels` whole panels from x[0]; running sums in sample order.
double Panels(const double* x, int32_t panels, int32_t method, double h) {
    double s = 0;
    switch (method) {
        case 1:
            for (int32_t p = 0; p < panels; ++p, x += 2) s += x[0] + 4 * x[1] + x[2];
            return s * (h / 3);
        case 2:
            for (int32_t p = 0; p < panels; ++p, x += 3) s += 3 * x[0] + 9 * x[1] + 9 * x[2] + 3 * x[3];
            return s * (h * 0.125);
        default:
            for (int32_t p = 0; p < panels; ++p, x += 4)
                s += 14 * x[0] + 64 * x[1] + 24 * x[2] + 64 * x[3] + 14 * x[4];
            return s * (h / 45);
    }
}

double Trapezoid(const double* x, int32_t n, double h) {
    double interior = 0;
    for (int32_t i = 1; i < n - 1; ++i) interior += x[i];
    return ((x[0] + x[n - 1]) * 0.5 + interior) * h;
}

double Sum(const double* x, int32_t n) {
    double s = 0;
    for (int32_t i = 0; i < n; ++i) s += x[i];
    return s;
}

// Leftover intervals closed at the end by a lower rule.
double EndTerm(const double* x, int32_t n, int32_t r, double h) {
    switch (r) {
        case 1: return 0.5 * h * (x[n - 1] + x[n - 2]);
        case 2: return h / 3 * (x[n - 3] + 4 * x[n - 2] + x[n - 1]);
        case 3: return h * 0.125 * (3 * (x[n - 4] + x[n - 1]) + 9 * (x[n - 3] + x[n - 2]));
        default: return 0;
    }
}

// Leftover intervals at the start: the first r intervals under the interpolating polynomial of
// the main rule's degree through the first samples.
double StartTerm(const double* x, int32_t method, int32_t r, double h) {
    switch (method * 4 + r) {
        case 1 * 4 + 1: return (5 * x[0] + 8 * x[1] - x[2]) * h / 12;
        case 2 * 4 + 1: return (9 * x[0] + 19 * x[1] - 5 * x[2] + x[3]) * h / 24;
        case 2 * 4 + 2: return (x[0] + 4 * x[1] + x[2]) * h / 3;
        case 3 * 4 + 1: return (251 * x[0] + 646 * x[1] - 264 * x[2] + 106 * x[3] - 19 * x[4]) * h / 720;
        case 3 * 4 + 2: return (29 * x[0] + 124 * x[1] + 24 * x[2] + 4 * x[3] - x[4]) * h / 90;
        case 3 * 4 + 3: return (27 * x[0] + 102 * x[1] + 72 * x[2] + 42 * x[3] - 3 * x[4]) * h / 80;
        default: return 0;
    }
}

}  // namespace

double IntegrateSamples(const double* x, int32_t n, double dt, int32_t method, IntegrationRules rules) {
    const double h = std::fabs(dt);
    if (method == 0) return Trapezoid(x, n, h);
    if (method == 4) return h * Sum(x, n - 1);
    if (method == 5) return h * Sum(x + 1, n - 1);
    const int32_t w = kWidth[method];
    const int32_t panels = (n - 1) / w, r = (n - 1) % w;
    if (rules == IntegrationRules::Older) return Panels(x, panels, method, h) + EndTerm(x, n, r, h);
    return Panels(x + r, panels, method, h) + StartTerm(x, method, r, h);
}

Status Integrate1D(const double* x, int32_t n, double dt, int32_t method, IntegrationRules rules,
                   double* result) {
    if (rules == IntegrationRules::Older) {
        if (method < 0 || method > 3) return InvalidSelectorErr;
        if (n < method + 2) return SizeMismatchErr;
    } else {
        // Widened: a method near the i32 limit must not wrap the minimum.
        const int64_t minimum = (method == 4 || method == 5) ? 2 : int64_t{method} + 2;
        if (n < minimum) return SizeMismatchErr;
        if (method < 0 || method > 5) return InvalidSelectorErr;
    }
    *result = IntegrateSamples(x, n, dt, method, rules);
    return 0;
}

namespace {

// Rows of cols samples with step spacing[0], then the row results with spacing[1].
double Integrate2D(const double* x, int32_t rows, int32_t cols, const double* spacing, int32_t method,
                   IntegrationRules rules, double* rowResults) {
    for (int32_t i = 0; i < rows; ++i)
        rowResults[i] = IntegrateSamples(x + static_cast<size_t>(i) * cols, cols, spacing[0], method, rules);
    return IntegrateSamples(rowResults, rows, spacing[1], method, rules);
}

}  // namespace

Status IntegrateGrid(const double* x, int32_t d0, int32_t d1, int32_t d2, const double* spacing, int32_t method,
                     IntegrationRules rules, double* result) {
    Scratch<double> work;
    if (work.Allocate(static_cast<size_t>(d0) + static_cast<size_t>(d2)) != 0) return OutOfMemoryErr;
    double* slabResults = work.get() + d0;
    const size_t slab = static_cast<size_t>(d0) * static_cast<size_t>(d1);
    for (int32_t k = 0; k < d2; ++k)
        slabResults[k] = Integrate2D(x + k * slab, d0, d1, spacing, method, rules, work.get());
    *result = d2 == 1 ? slabResults[0] : IntegrateSamples(slabResults, d2, spacing[2], method, rules);
    return work.Release();
}

}  // namespace tw
