// Interpolation through all points of a table by the tableau of corrections: Neville's for the
// polynomial, Bulirsch and Stoer's for the diagonal rational function.
#include <cmath>

#include "fit/spline.hpp"

namespace tw {

namespace {

// The table entry nearest to xi, the first one on a tie.
int32_t Nearest(const double* x, int32_t n, double xi) {
    int32_t ns = 0;
    double dif = std::fabs(xi - x[0]);
    for (int32_t i = 1; i < n; ++i) {
        const double dift = std::fabs(xi - x[i]);
        if (dift < dif) {
            ns = i;
            dif = dift;
        }
    }
    return ns;
}

// Walks the tableau from entry ns: the c correction while room remains above the centre line,
// the d correction afterwards. step(m) updates both columns for one level.
template <class Step>
Status Walk(const double* y, const double* c, const double* d, int32_t n, int32_t ns, double* yi, double* dy,
            Step step) {
    double sum = y[ns--];
    double last = 0;
    for (int32_t m = 1; m < n; ++m) {
        if (const Status s = step(m)) return s;
        last = 2 * (ns + 1) < n - m ? c[ns + 1] : d[ns--];
        sum += last;
    }
    *yi = sum;
    *dy = last;
    return 0;
}

}  // namespace

Status PolyInterpCore(const double* x, const double* y, int32_t n, double xi, double* yi, double* dy) {
    if (n < 1) return EmptyArrayErr;
    Scratch<double> work;
    if (work.Allocate(2 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* c = work.get();
    double* d = c + n;
    for (int32_t i = 0; i < n; ++i) c[i] = d[i] = y[i];
    const Status s = Walk(y, c, d, n, Nearest(x, n, xi), yi, dy, [&](int32_t m) -> Status {
        for (int32_t i = 0; i < n - m; ++i) {
            const double ho = x[i] - xi, hp = x[i + m] - xi;
            const double den = ho - hp;
            if (den == 0) return NotAscendingErr;  // x[i] equals x[i + m]
            const double f = (c[i + 1] - d[i]) / den;
            d[i] = hp * f;
            c[i] = ho * f;
        }
        return 0;
    });
    return MergeRelease(s, work.Release());
}

Status RatInterpCore(const double* x, const double* y, int32_t n, double xi, double* yi, double* dy) {
    if (n < 1) return EmptyArrayErr;
    for (int32_t i = 0; i < n; ++i)
        if (xi - x[i] == 0) {
            *yi = y[i];
            *dy = 0;
            return 0;
        }
    Scratch<double> work;
    if (work.Allocate(2 * static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
    double* c = work.get();
    double* d = c + n;
    // The small offset of the d column keeps a 0 / 0 away where y vanishes.
    for (int32_t i = 0; i < n; ++i) {
        c[i] = y[i];
        d[i] = y[i] + 1e-10;
    }
    const Status s = Walk(y, c, d, n, Nearest(x, n, xi), yi, dy, [&](int32_t m) -> Status {
        for (int32_t i = 0; i < n - m; ++i) {
            if (x[i] == x[i + m]) return NotAscendingErr;
            const double w = c[i + 1] - d[i];
            const double h = x[i + m] - xi;
            const double t = (x[i] - xi) * d[i] / h;
            double dd = t - c[i + 1];
            if (dd == 0) return ZeroDenominatorErr;
            dd = w / dd;
            d[i] = c[i + 1] * dd;
            c[i] = t * dd;
        }
        return 0;
    });
    return MergeRelease(s, work.Release());
}

}  // namespace tw
