// Least-squares engine and fit models on plain arrays: x, y and weights of n samples, a weights
// pointer of null meaning unweighted. Scratch memory comes from the routed scratch allocator.
//
// A core writes fitted values only into a best-fit buffer it was given; that buffer may be y
// itself (the exports that return the fit in y pass y).
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// --- Shared pieces -------------------------------------------------------------------------------

// Weight vetting: a NaN weight is NanInfErr; between n - degenerate and n - 1 zero weights is
// DegenerateDataErr (degenerate 1 for the line and two-parameter models, 2 for the Gaussian); all
// zero makes the fit unweighted. *vetted is w, or null when the fit is to be unweighted.
Status VetWeights(const double* w, int32_t n, int32_t degenerate, const double** vetted);

// How a fit's mean squared error walks and weighs its terms ((f - 2y) f + y y, sum over n):
// Forward: first to last, weighted term * |w| (the least-squares fits);
// Model: last to first unweighted, first to last weighted with |term * w| (the nonlinear models).
enum class MseWalk { Forward, Model };
double FitMse(const double* y, const double* f, const double* w, int32_t n, MseWalk walk);

// Tolerance and floor of the iterative models: zero or negative means the default.
inline double IterationTolerance(double tol) { return tol > 0 ? tol : 0.0001; }
inline double MseFloor(double floor) { return floor > 0 ? floor : 1e-12; }

// --- Least squares ------------------------------------------------------------------------------

// Straight line y = slope x + intercept, weights vetted here. fit and mse may be null; fit may be y.
Status LineFit(const double* x, const double* y, const double* w, int32_t n, double* slope, double* intercept,
               double* fit, double* mse);

// Least squares on the row-major n by k design h, weights used as |w| (not vetted).
// method 0 SVD without cut-off, 1-3 economy QR, 4 normal equations by LU, 5 by Cholesky,
// 6 SVD with cut-off n s0 eps. coef gets k values; covariance (k by k) may be null; fit (n) and
// mse are formed only when both are given.
Status GeneralLeastSquares(const double* h, int32_t n, int32_t k, const double* y, const double* w,
                           uint32_t method, double* coef, double* covariance, double* fit, double* mse);

// Fit kinds of the polynomial core.
enum PolyFitKind : int32_t { PolyLeastSquares = 0, PolyLeastAbsolute = 1, PolyBisquare = 2 };

struct PolyTerms {
    const int32_t* powers;  // fixed-term powers, count of them
    const double* values;
    int32_t count;
};

// Tuning of the robust kinds: two tolerances and a flag (the plain exports pass -1, -1 and 0);
// iterations is the robust loop's limit in and count out (null: limit 0).
struct RobustTuning {
    double tolerance1;
    double tolerance2;
    int32_t flag;
    int32_t* iterations;
};
inline constexpr RobustTuning kPlainTuning{-1.0, -1.0, 0, nullptr};

// Polynomial of the given order in ascending coefficients (order + 1 of them), weights vetted
// here. fit and mse may be null; the fit and mse always come from Horner's rule over all
// coefficients. Orders above 25 fit at most 26 free columns, +20031.
Status PolyFitCore(const double* x, const double* y, const double* w, int32_t n, int32_t order, int32_t method,
                   PolyTerms fixed, int32_t kind, RobustTuning tuning, double* coef, double* fit, double* mse);

// sse, R squared and rmse of fitted values f against y; weights (or null) as given, signed.
Status GoodnessOfFitCore(const double* y, const double* f, const double* w, int32_t n, int32_t dof, double* sse,
                         double* rSquared, double* rmse);

// --- Nonlinear models ---------------------------------------------------------------------------

// Iteration inputs shared by the iterative models. iterations is the limit in and the count of
// steps out (may be null: limit 0).
struct IterationInputs {
    double tolerance;
    double floor;
    int32_t* iterations;
};

// A guess of the model's parameter count, or null for none.
// Exponential a exp(b x): method 0 log-linear estimate, 1 Gauss-Newton refinement; any other
// method writes nothing and returns 0.
Status ExpFitCore(const double* x, const double* y, const double* w, int32_t n, int32_t method, const double* guess,
                  IterationInputs it, double* a, double* b, double* fit, double* mse);
// Power a x^b.
Status PowerFitCore(const double* x, const double* y, const double* w, int32_t n, const double* guess,
                    IterationInputs it, double* a, double* b, double* fit, double* mse);
// Logarithm a log_base(b x).
Status LogFitCore(const double* x, const double* y, const double* w, int32_t n, double base, double* a, double* b,
                  double* fit, double* mse);
// The logarithm of the log model: 2.71828 exactly means ln, 10 log10, else ln v / ln base.
double LogBase(double v, double base);
// Gaussian peak a exp(-0.5 ((x - c) / s)^2).
Status GaussianPeakFitCore(const double* x, const double* y, const double* w, int32_t n, const double* guess,
                           IterationInputs it, double* a, double* c, double* s, double* fit, double* mse);

}  // namespace tw
