// The interpolating cubic spline (tridiagonal sweep and evaluation) and Reinsch's smoothing spline.
#include "fit/spline.hpp"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "matrix/solve.hpp"

namespace tw {

Status SplineSecondDerivatives(const double* x, const double* y, int32_t n, double yp1, double ypn,
                               double* y2, double* u) {
    if (n < 2) return TooFewSamples2Err;
    // Descending tables are legal; a repeated abscissa is not, and neither is a turn back onto
    // the same x, whose span would divide by zero.
    for (int32_t i = 0; i + 1 < n; ++i)
        if (x[i + 1] - x[i] == 0 || (i > 0 && x[i + 1] - x[i - 1] == 0)) return NotAscendingErr;
    Scratch<double> work;
    if (u == nullptr) {
        if (work.Allocate(static_cast<size_t>(n)) != 0) return OutOfMemoryErr;
        u = work.get();
    }
    if (yp1 < kNaturalEndThreshold) {
        y2[0] = -0.5;
        u[0] = (3 / (x[1] - x[0])) * ((y[1] - y[0]) / (x[1] - x[0]) - yp1);
    } else {
        y2[0] = u[0] = 0;
    }
    for (int32_t i = 1; i + 1 < n; ++i) {
        const double sig = (x[i] - x[i - 1]) / (x[i + 1] - x[i - 1]);
        const double q = sig * y2[i - 1] + 2;
        y2[i] = (sig - 1) / q;
        u[i] = (6 * ((y[i + 1] - y[i]) / (x[i + 1] - x[i]) - (y[i] - y[i - 1]) / (x[i] - x[i - 1])) /
                    (x[i + 1] - x[i - 1]) -
                sig * u[i - 1]) /
               q;
    }
    double qn = 0, un = 0;
    if (ypn < kNaturalEndThreshold) {
        const double h = x[n - 1] - x[n - 2];
        qn = 0.5;
        un = (3 / h) * (ypn - (y[n - 1] - y[n - 2]) / h);
    }
    y2[n - 1] = (un - qn * u[n - 2]) / (qn * y2[n - 2] + 1);
    for (int32_t k = n - 2; k >= 0; --k) y2[k] = y2[k] * y2[k + 1] + u[k];
    return work.Release();
}

Status SplineValue(const double* x, const double* y, const double* y2, int32_t n, double xi, double* yi) {
    const bool ascending = !(x[n - 1] <= x[0]);
    int32_t lo = 0, hi = n - 1;
    while (hi - lo > 1) {
        const int32_t k = lo + (hi - lo) / 2;
        if ((x[k] > xi) == ascending)
            hi = k;
        else
            lo = k;
    }
    const double h = x[hi] - x[lo];
    if (h == 0) return NotAscendingErr;
    const double a = (x[hi] - xi) / h, b = (xi - x[lo]) / h;
    *yi = a * y[lo] + b * y[hi] + ((a * a * a - a) * y2[lo] + (b * b * b - b) * y2[hi]) * h * h / 6;
    return 0;
}

namespace {

// The pentadiagonal system of the smoothing spline: Q (rows qa, qb, qc at columns i, i + 1,
// i + 2, the point factors folded in) times its transpose plus R, over n - 2 unknowns.
struct Pentadiagonal {
    const double* qa;
    const double* qb;
    const double* qc;
    const double* hr;  // the intervals as R sees them (balanced)
    double p;
    int32_t m;  // unknowns

    double Diagonal(int32_t i) const {
        return qa[i] * qa[i] + qb[i] * qb[i] + qc[i] * qc[i] + 2 * (hr[i] + hr[i + 1]) * p;
    }
    double First(int32_t i) const { return qb[i] * qa[i + 1] + qc[i] * qb[i + 1] + hr[i + 1] * p; }
    double Second(int32_t i) const { return qc[i] * qa[i + 2]; }
};

// Solves the system for the right side rhs in place: dense LU for fewer than 5 unknowns, where the
// band solver has no room for its two sub- and super-diagonals.
Status SolvePentadiagonal(const Pentadiagonal& a, double* band, double* rhs) {
    const int32_t m = a.m;
    if (m < 5) {
        double dense[16] = {};
        for (int32_t i = 0; i < m; ++i) {
            dense[i * m + i] = a.Diagonal(i);
            if (i + 1 < m) dense[i * m + i + 1] = dense[(i + 1) * m + i] = a.First(i);
            if (i + 2 < m) dense[i * m + i + 2] = dense[(i + 2) * m + i] = a.Second(i);
        }
        double sol[4];
        const Status s = SolveByLu(dense, m, m, rhs, sol);
        if (s == 0) std::memcpy(rhs, sol, static_cast<size_t>(m) * sizeof(double));
        return s;
    }
    // Band storage by rows: row 2 + i - j holds element (i, j).
    std::fill(band, band + 5 * static_cast<size_t>(m), 0.0);
    double *r0 = band, *r1 = band + m, *r2 = band + 2 * static_cast<size_t>(m), *r3 = r2 + m, *r4 = r3 + m;
    for (int32_t i = 0; i < m; ++i) {
        r2[i] = a.Diagonal(i);
        if (i + 1 < m) r1[i + 1] = r3[i] = a.First(i);
        if (i + 2 < m) r0[i + 2] = r4[i] = a.Second(i);
    }
    return BandSolve(band, m, 2, 2, rhs, 1);
}

}  // namespace

Status SmoothingSplineCore(const double* x, double* y, const double* w, const double* balance, int32_t n,
                           double p, double* error) {
    if (n < 2) return TooFewSamples2Err;
    *error = 0;
    if (n == 2 || p == 1) return 0;
    for (int32_t i = 0; i + 1 < n; ++i)
        if (!(x[i + 1] - x[i] > 0)) return NotAscendingErr;
    // Not inside 0..1 (NaN included) asks for the choice from the data span.
    if (!(p >= 0 && p <= 1)) {
        const double t = (x[n - 1] - x[0]) / n;
        p = 8 / (8 + t * t * t);
    }
    const size_t nn = static_cast<size_t>(n), m = nn - 2;
    Scratch<double> block;
    if (block.Allocate(3 * nn + 5 * m + m + 3 * m + nn) != 0) return OutOfMemoryErr;
    double* s = block.get();
    double* h = s + nn;
    double* hr = h + nn;
    double* band = hr + nn;
    double* rhs = band + 5 * m;
    double* qa = rhs + m;
    double* qb = qa + m;
    double* qc = qb + m;
    double* u = qc + m;
    const double d = std::sqrt(6 * (1 - p));
    for (size_t i = 0; i < nn; ++i) {
        if (w != nullptr && w[i] == 0) return DegenerateDataErr;
        s[i] = w != nullptr ? d / std::sqrt(std::fabs(w[i])) : d;
    }
    for (size_t i = 0; i + 1 < nn; ++i) {
        h[i] = x[i + 1] - x[i];
        if (balance != nullptr && balance[i] == 0) return DegenerateDataErr;
        hr[i] = balance != nullptr ? h[i] / std::fabs(balance[i]) : h[i];
    }
    for (size_t i = 0; i < m; ++i) {
        qa[i] = s[i] / h[i];
        qb[i] = -(1 / h[i] + 1 / h[i + 1]) * s[i + 1];
        qc[i] = s[i + 2] / h[i + 1];
        rhs[i] = qa[i] * (y[i] / s[i]) + qb[i] * (y[i + 1] / s[i + 1]) + qc[i] * (y[i + 2] / s[i + 2]);
    }
    const Pentadiagonal a{qa, qb, qc, hr, p, static_cast<int32_t>(m)};
    Status st = SolvePentadiagonal(a, band, rhs);
    if (st != 0) return MergeRelease(st, block.Release());
    // u = Q^T solution; the fit is y - u s, the data term p sum (u s)^2 (unweighted by design).
    std::fill(u, u + nn, 0.0);
    for (size_t i = 0; i < m; ++i) {
        u[i] += qa[i] * rhs[i];
        u[i + 1] += qb[i] * rhs[i];
        u[i + 2] += qc[i] * rhs[i];
    }
    double data = 0;
    for (size_t i = 0; i < nn; ++i) {
        const double r = u[i] * s[i];
        y[i] = y[i] - r;
        data += r * r;
    }
    data = p * data;
    // The roughness of the fit, from its natural-end second derivatives (c over the first n of
    // the spent band block, the sweep's workspace over the next n).
    double* c = band;
    st = SplineSecondDerivatives(x, y, n, kNaturalEnd, kNaturalEnd, c, s);
    if (st == 0) {
        double rough = 0;
        for (size_t i = 0; i + 1 < nn; ++i) {
            double term = (h[i] * (1 - p) * (c[i] * c[i + 1] + c[i] * c[i] + c[i + 1] * c[i + 1])) / 3;
            if (balance != nullptr) term *= std::fabs(balance[i]);
            rough += term;
        }
        *error = data + rough;
    }
    return MergeRelease(st, block.Release());
}

}  // namespace tw
