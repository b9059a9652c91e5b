// Weight vetting, the fit mse, the straight line, the general least-squares core and goodness of fit.
#include <algorithm>
#include <cmath>
#include <cstring>

#include "fit/fit_core.hpp"
#include "matrix/decompose.hpp"
#include "matrix/matrix_core.hpp"
#include "matrix/solve.hpp"
#include "stats/descriptive.hpp"

namespace tw {

namespace {

size_t Cells(int32_t rows, int32_t cols) { return static_cast<size_t>(rows) * static_cast<size_t>(cols); }

// The expanded square: its rounding is part of the result.
inline double MseTerm(double y, double f) { return (f - 2 * y) * f + y * y; }

// The scaled system [sqrt|w| h, sqrt|w| y] reduced by Householder QR to its k + 1 by k + 1
// triangle: the leading k by k block is R and its last column holds Q^T b. Q is never formed.
// Tall systems go through in blocks of rows that stay in cache, each block stacked under the
// triangle so far and reduced with it.
Status ReduceScaled(const double* h, const double* y, const double* w, int32_t n, int32_t k, double* r1) {
    const int32_t k1 = k + 1;
    const int32_t block = std::min(n, std::max(k1, 32768 / k1));
    Scratch<double> work;
    if (work.Allocate(Cells(block + k1, k1)) != 0) return OutOfMemoryErr;
    double* stack = work.get();
    std::fill(r1, r1 + Cells(k1, k1), 0.0);
    Status st = 0;
    int32_t carried = 0;
    for (int32_t first = 0; first < n && st == 0; first += block) {
        const int32_t rows = std::min(block, n - first);
        for (int32_t i = 0; i < rows; ++i) {
            const double* hi = h + Cells(first + i, k);
            double* ai = stack + Cells(carried + i, k1);
            const double g = w != nullptr ? std::sqrt(std::fabs(w[first + i])) : 1.0;
            for (int32_t j = 0; j < k; ++j) ai[j] = w != nullptr ? hi[j] * g : hi[j];
            ai[k] = w != nullptr ? y[first + i] * g : y[first + i];
            // The scaled design is screened; y is not.
            if (HasNonFinite(ai, k)) st = NanInfErr;
        }
        if (st == 0) st = QrHouseholder<double>(stack, carried + rows, k1, 2, nullptr, r1);
        carried = std::min(carried + rows, k1);
        std::memcpy(stack, r1, Cells(carried, k1) * sizeof(double));
    }
    return MergeRelease(st, work.Release());
}

// Methods 0 and 6: the SVD of the scaled design through that of its triangle, R = U S V^T, so that
// u_i . b is (U^T Q^T b)_i; coefficients from the triplets above the cut-off, covariance
// V S^-2 V^T.
Status SvdLeastSquares(const double* h, int32_t n, int32_t k, const double* y, const double* w, bool cutOff,
                       double* coef, double* covariance) {
    const int32_t k1 = k + 1;
    Scratch<double> work;
    if (work.Allocate(Cells(k1, k1) + 3 * Cells(k, k) + 2 * static_cast<size_t>(k)) != 0) return OutOfMemoryErr;
    double* r1 = work.get();
    double* r = r1 + Cells(k1, k1);
    double* u = r + Cells(k, k);
    double* v = u + Cells(k, k);
    double* s = v + Cells(k, k);
    double* proj = s + k;
    Status st = ReduceScaled(h, y, w, n, k, r1);
    for (int32_t i = 0; i < k; ++i) std::memcpy(r + Cells(i, k), r1 + Cells(i, k1), Cells(1, k) * sizeof(double));
    if (st == 0) st = FullSvd<double>(r, k, k, u, s, v);
    if (st != 0) return MergeRelease(st, work.Release());
    const double t = cutOff ? n * s[0] * 2.220446049250313e-16 : 0.0;
    std::fill(proj, proj + k, 0.0);
    for (int32_t j = 0; j < k; ++j) {
        const double qtb = r1[Cells(j, k1) + k];
        for (int32_t i = 0; i < k; ++i) proj[i] += u[Cells(j, k) + i] * qtb;
    }
    std::fill(coef, coef + k, 0.0);
    for (int32_t i = 0; i < k; ++i) {
        if (!(s[i] > t)) continue;
        const double d = proj[i] / s[i];
        for (int32_t j = 0; j < k; ++j) coef[j] += d * v[Cells(j, k) + i];
    }
    if (covariance != nullptr) {
        for (int32_t i = 0; i < k; ++i) {
            const double inv = s[i] > t ? 1 / s[i] : 0.0;
            for (int32_t j = 0; j < k; ++j) v[Cells(j, k) + i] *= inv;
        }
        for (int32_t i = 0; i < k; ++i)
            for (int32_t j = 0; j < k; ++j) {
                double sum = 0;
                for (int32_t c = 0; c < k; ++c) sum += v[Cells(i, k) + c] * v[Cells(j, k) + c];
                covariance[Cells(i, k) + j] = sum;
            }
    }
    return work.Release();
}

// Methods 1 to 3: back substitution of R c = Q^T b; covariance the pseudo-inverse of R^T R.
Status QrLeastSquares(const double* h, int32_t n, int32_t k, const double* y, const double* w, double* coef,
                      double* covariance) {
    const int32_t k1 = k + 1;
    Scratch<double> work;
    if (work.Allocate(Cells(k1, k1) + Cells(k, k)) != 0) return OutOfMemoryErr;
    double* r = work.get();
    double* rtr = r + Cells(k1, k1);
    Status st = ReduceScaled(h, y, w, n, k, r);
    if (st != 0) return MergeRelease(st, work.Release());
    for (int32_t i = 0; i < k; ++i) coef[i] = r[Cells(i, k1) + k];
    for (int32_t i = k - 1; i >= 0; --i) {
        const double* ri = r + Cells(i, k1);
        if (ri[i] == 0) return MergeRelease(SingularMatrixErr, work.Release());
        double sum = coef[i];
        for (int32_t j = i + 1; j < k; ++j) sum -= ri[j] * coef[j];
        coef[i] = sum / ri[i];
    }
    if (covariance != nullptr) {
        for (int32_t i = 0; i < k; ++i)
            for (int32_t j = 0; j < k; ++j) {
                double sum = 0;
                for (int32_t c = 0; c <= std::min(i, j); ++c) sum += r[Cells(c, k1) + i] * r[Cells(c, k1) + j];
                rtr[Cells(i, k) + j] = sum;
            }
        st = PseudoInverse<double>(rtr, k, k, -1.0, covariance);
    }
    return MergeRelease(st, work.Release());
}

// Methods 4 and 5: G = H^T W H and g = H^T W y, solved by LU or Cholesky; no screen.
Status NormalLeastSquares(const double* h, int32_t n, int32_t k, const double* y, const double* w, bool cholesky,
                          double* coef, double* covariance) {
    Scratch<double> work;
    Scratch<int32_t> perm;
    if (work.Allocate(Cells(k, k) * 2 + static_cast<size_t>(k)) != 0 || perm.Allocate(static_cast<size_t>(k)) != 0)
        return OutOfMemoryErr;
    double* g = work.get();
    double* factor = g + Cells(k, k);
    double* rhs = factor + Cells(k, k);
    std::fill(g, g + Cells(k, k), 0.0);
    std::fill(rhs, rhs + k, 0.0);
    for (int32_t r = 0; r < n; ++r) {
        const double* hr = h + Cells(r, k);
        const double wr = w != nullptr ? std::fabs(w[r]) : 1.0;
        for (int32_t i = 0; i < k; ++i) {
            const double t = w != nullptr ? hr[i] * wr : hr[i];
            for (int32_t j = i; j < k; ++j) g[Cells(i, k) + j] += t * hr[j];
            rhs[i] += t * y[r];
        }
    }
    for (int32_t i = 0; i < k; ++i)
        for (int32_t j = 0; j < i; ++j) g[Cells(i, k) + j] = g[Cells(j, k) + i];
    Status st = covariance != nullptr ? PseudoInverse<double>(g, k, k, -1.0, covariance) : 0;
    if (st == 0 && !cholesky) {
        std::memcpy(factor, g, Cells(k, k) * sizeof(double));
        int32_t parity = 0;
        st = LuFactor<double>(factor, k, k, perm.get(), &parity);
        if (st == SingularPivotWarn) st = SingularMatrixErr;
        if (st == 0) st = LuSolve<double>(factor, perm.get(), rhs, k, coef);
    } else if (st == 0) {
        PackCompact<double>(g, k, 0, factor);
        st = CholeskyFactor<double>(factor, k);
        if (st == 0) CholeskySolve<double>(factor, rhs, k, coef);
    }
    return MergeRelease(MergeRelease(st, work.Release()), perm.Release());
}

}  // namespace

Status VetWeights(const double* w, int32_t n, int32_t degenerate, const double** vetted) {
    *vetted = nullptr;
    if (w == nullptr) return 0;
    int32_t zeros = 0;
    for (int32_t i = 0; i < n; ++i) {
        if (std::isnan(w[i])) return NanInfErr;
        zeros += w[i] == 0;
    }
    if (zeros >= n - degenerate && zeros <= n - 1) return DegenerateDataErr;
    if (zeros < n) *vetted = w;
    return 0;
}

double FitMse(const double* y, const double* f, const double* w, int32_t n, MseWalk walk) {
    double sum = 0;
    if (w == nullptr && walk == MseWalk::Forward) {
        MeanSquaredError(y, n, f, n, &sum);
        return sum;
    }
    if (w == nullptr) {
        for (int32_t i = n - 1; i >= 0; --i) sum += MseTerm(y[i], f[i]);
    } else if (walk == MseWalk::Forward) {
        for (int32_t i = 0; i < n; ++i) sum += MseTerm(y[i], f[i]) * std::fabs(w[i]);
    } else {
        for (int32_t i = 0; i < n; ++i) sum += std::fabs(MseTerm(y[i], f[i]) * w[i]);
    }
    return sum / n;
}

Status LineFit(const double* x, const double* y, const double* w, int32_t n, double* slope, double* intercept,
               double* fit, double* mse) {
    if (n < 2) return TooFewSamples2Err;
    const double* vw = nullptr;
    if (const Status s = VetWeights(w, n, 1, &vw)) return s;
    double m, c;
    if (vw == nullptr) {
        double sx = 0, sxx = 0, sy = 0, sxy = 0;
        for (int32_t i = 0; i < n; ++i) {
            sx += x[i];
            sxx += x[i] * x[i];
            sy += y[i];
            sxy += x[i] * y[i];
        }
        // Equal x make d = 0 and the results non-finite, deliberately unguarded.
        const double d = sx * sx - sxx * n;
        m = (sy * sx - sxy * n) / d;
        c = (sxy * sx - sy * sxx) / d;
    } else {
        double top = 0;
        for (int32_t i = 0; i < n; ++i) top = std::max(top, std::fabs(vw[i]));
        double s = 0, sx = 0, sy = 0, sxy = 0, sxx = 0;
        for (int32_t i = 0; i < n; ++i) {
            const double v = std::fabs(vw[i]) / top;
            s += v;
            sx += v * x[i];
            sy += v * y[i];
            sxy += v * x[i] * y[i];
            sxx += v * x[i] * x[i];
        }
        m = (sy * sx - sxy * s) / (sx * sx - sxx * s);
        c = (sy - m * sx) / s;
    }
    *slope = m;
    *intercept = c;
    if (fit == nullptr && mse == nullptr) return 0;
    // One pass, y read before the fit replaces it: fit may be y.
    double sum = 0;
    for (int32_t i = 0; i < n; ++i) {
        const double f = x[i] * m + c;
        const double term = MseTerm(y[i], f);
        sum += vw != nullptr ? term * std::fabs(vw[i]) : term;
        if (fit != nullptr) fit[i] = f;
    }
    if (mse != nullptr) *mse = sum / n;
    return 0;
}

Status GeneralLeastSquares(const double* h, int32_t n, int32_t k, const double* y, const double* w,
                           uint32_t method, double* coef, double* covariance, double* fit, double* mse) {
    if (k < 1) return OrderNotPositiveErr;
    if (n < k) return PolyOrderErr;
    if (method > 6) return InvalidSelectorErr;
    Status st;
    if (method == 0 || method == 6)
        st = SvdLeastSquares(h, n, k, y, w, method == 6, coef, covariance);
    else if (method <= 3)
        st = QrLeastSquares(h, n, k, y, w, coef, covariance);
    else
        st = NormalLeastSquares(h, n, k, y, w, method == 5, coef, covariance);
    if (st < 0 || fit == nullptr || mse == nullptr) return st;
    AxVect<double>(h, n, k, coef, fit);
    *mse = FitMse(y, fit, w, n, MseWalk::Forward);
    return st;
}

Status GoodnessOfFitCore(const double* y, const double* f, const double* w, int32_t n, int32_t dof, double* sse,
                         double* rSquared, double* rmse) {
    if (n < 2) return TooFewSamples2Err;
    if (dof >= n) return SampleCountErr;
    if (dof < 1) dof = n - 2;
    double m = 0;
    Mean(y, n, &m);
    double e = 0, t = 0;
    if (w == nullptr) {
        for (int32_t i = 0; i < n; ++i) {
            e += MseTerm(y[i], f[i]);
            t += (y[i] - 2 * m) * y[i];
        }
        t += n * m * m;
    } else {
        for (int32_t i = 0; i < n; ++i) {
            e += MseTerm(y[i], f[i]) * w[i];
            t += ((y[i] - 2 * m) * y[i] + m * m) * w[i];
        }
    }
    *sse = e;
    *rmse = std::sqrt(e / dof);
    *rSquared = t == 0 ? (e == 0 ? 1.0 : INFINITY) : 1 - e / t;
    return 0;
}

}  // namespace tw
