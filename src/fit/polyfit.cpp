// Polynomial fit with optional weights and fixed terms, on an unscaled Vandermonde design.
#include <algorithm>
#include <cmath>
#include <cstring>

#include "fit/fit_core.hpp"
#include "fit/robust.hpp"

namespace tw {

namespace {

// Beyond this power the Vandermonde design is too ill-conditioned to be of use.
constexpr int32_t kTopPower = 25;

size_t Cells(int32_t rows, int32_t cols) { return static_cast<size_t>(rows) * static_cast<size_t>(cols); }

// The fit kinds on a design; the robust kinds and their tuning live with the robust fits.
Status SolveKind(int32_t kind, RobustTuning tuning, const double* h, int32_t n, int32_t k, const double* y,
                 const double* w, int32_t method, double* coef) {
    if (kind != PolyLeastSquares)
        return RobustPolySolve(kind, tuning, h, n, k, y, w, static_cast<uint32_t>(method), coef);
    return GeneralLeastSquares(h, n, k, y, w, static_cast<uint32_t>(method), coef, nullptr, nullptr, nullptr);
}

}  // namespace

Status PolyFitCore(const double* x, const double* y, const double* w, int32_t n, int32_t order, int32_t method,
                   PolyTerms fixed, int32_t kind, RobustTuning tuning, double* coef, double* fit, double* mse) {
    if (fixed.count < 0 || order < 0) return NegativeOrderErr;
    if (n <= order - fixed.count) return PolyOrderErr;
    const double* vw = nullptr;
    if (const Status s = VetWeights(w, n, 1, &vw)) return s;

    Status st = 0;
    Scratch<int32_t> map;
    Scratch<double> work;
    if (fixed.count == 0) {
        const int32_t k = std::min(order, kTopPower) + 1;
        if (work.Allocate(Cells(n, k)) != 0) return OutOfMemoryErr;
        double* h = work.get();
        for (int32_t i = 0; i < n; ++i) {
            double* row = h + Cells(i, k);
            row[0] = 1.0;
            for (int32_t j = 1; j < k; ++j) row[j] = row[j - 1] * x[i];
        }
        st = SolveKind(kind, tuning, h, n, k, y, vw, method, coef);
        std::fill(coef + k, coef + order + 1, 0.0);
        if (order > kTopPower && st == 0) st = OrderClampedWarn;
    } else {
        if (map.Allocate(static_cast<size_t>(order) + 1) != 0) return OutOfMemoryErr;
        int32_t* index = map.get();
        std::fill(index, index + order + 1, -1);
        for (int32_t j = 0; j < fixed.count; ++j) {
            const int32_t p = fixed.powers[j];
            if (p >= 0 && p <= order) index[p] = j;  // a power named twice keeps its later value
        }
        int32_t top = order;
        bool clamped = false;
        if (order > kTopPower) {
            clamped = true;
            int32_t seen = 0, second = -1;
            for (int32_t p = 0; p <= order && second < 0; ++p)
                if (index[p] < 0 && ++seen == 2) second = p;
            if (second >= 0) top = std::max(second, kTopPower);
        }
        int32_t k = 0;
        for (int32_t p = 0; p <= top; ++p) k += index[p] < 0;
        if (k == 0) {
            for (int32_t p = 0; p <= order; ++p) coef[p] = fixed.values[index[p]];
        } else {
            if (work.Allocate(Cells(n, k) + static_cast<size_t>(n) + static_cast<size_t>(k)) != 0)
                return MergeRelease(OutOfMemoryErr, map.Release());
            double* h = work.get();
            double* target = h + Cells(n, k);
            double* solved = target + n;
            for (int32_t i = 0; i < n; ++i) {
                double* row = h + Cells(i, k);
                double t = y[i], p = 1.0;
                int32_t col = 0;
                for (int32_t power = 0; power <= order; ++power) {
                    if (index[power] >= 0)
                        t -= fixed.values[index[power]] * p;
                    else if (power <= top)
                        row[col++] = p;
                    p *= x[i];
                }
                target[i] = t;
            }
            st = SolveKind(kind, tuning, h, n, k, target, vw, method, solved);
            int32_t col = 0;
            for (int32_t p = 0; p <= order; ++p)
                coef[p] = index[p] >= 0 ? fixed.values[index[p]] : p <= top ? solved[col++] : 0.0;
        }
        if (clamped && st == 0) st = OrderClampedWarn;
    }
    st = MergeRelease(MergeRelease(st, work.Release()), map.Release());
    if (st < 0 || (fit == nullptr && mse == nullptr)) return st;

    double sum = 0;
    for (int32_t i = 0; i < n; ++i) {
        double f = coef[order];
        for (int32_t p = order - 1; p >= 0; --p) f = f * x[i] + coef[p];
        const double term = (f - 2 * y[i]) * f + y[i] * y[i];
        sum += vw != nullptr ? term * std::fabs(vw[i]) : term;
        if (fit != nullptr) fit[i] = f;
    }
    if (mse != nullptr) *mse = sum / n;
    return st;
}

}  // namespace tw
