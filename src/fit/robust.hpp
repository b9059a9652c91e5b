// Robust fits: iteratively reweighted bisquare (Tukey biweight with leverage-adjusted residuals)
// and least absolute residual, around the least-squares cores of fit_core.hpp.
#pragma once

#include <cstdint>

#include "fit/bounded.hpp"
#include "fit/fit_core.hpp"

namespace tw {

// Robust weights of adjusted residuals r: rw[i] = (1 - u^2)^2 for |u| < 1, else 0, with
// u = r K, K = 0.6745 / (4.685 s) and s the median absolute deviation (mean if that is 0), times
// |w[i]| when w is given. *scaleZero means the residuals are as good as exact (rw not written).
Status BisquarePass(const double* r, const double* w, int32_t n, double* rw, int32_t* zeros, bool* scaleZero);

// Leverage adjustment of the n by k design j: adj[i] = sqrt(q / (1 - h[i])), h the diagonal of
// J pinv(J^T W J) J^T, q = |w[i]| or 1. leverageByWeight multiplies h by |w[i]| as well.
Status LeverageAdjust(const double* j, const double* w, int32_t n, int32_t k, bool leverageByWeight,
                      double* adj);

// Weights of a reweighting pass: 1 / max(|y - f|, t), times |w| when given, with t 0.01 times the
// median |y - f| (1e-7 when that is 0); r is scratch of n.
Status InverseResidualWeights(const double* y, const double* f, const double* w, int32_t n, double* r,
                              double* v);

// Mean absolute residual (1 / n) sum |(y - f) w|, w null meaning 1.
double MeanAbsResidual(const double* y, const double* f, const double* w, int32_t n);

// General bisquare core on the row-major n by k design h, weights w (|w|, or null). iterations:
// limit in, completed refits out. weightsOut (n, may be null) gets the last refit's weights, and
// is left alone when no refit completed. fit is always written; mse is the last fit's own (with
// its weights). covariance (of the plain fit) may be null.
Status GenBisquareCore(const double* h, int32_t n, int32_t k, const double* y, const double* w,
                       double* weightsOut, uint32_t method, double tolerance, int32_t* iterations,
                       double* coef, double* fit, double* covariance, double* mse);

// General least-absolute-residual core by reweighting; iterations is read only. fit and mae are
// always written, covariance may be null.
Status GenLarCore(const double* h, int32_t n, int32_t k, const double* y, const double* w, uint32_t method,
                  double tolerance, double floor, int32_t limit, double* coef, double* fit,
                  double* covariance, double* mae);

// Robust kinds of the polynomial core: tuning.tolerance1 is the tolerance, tuning.tolerance2 the
// floor, tuning.iterations the limit (and the count of bisquare refits out).
Status RobustPolySolve(int32_t kind, RobustTuning tuning, const double* h, int32_t n, int32_t k,
                       const double* y, const double* w, uint32_t method, double* coef);

// Robust straight lines. fit (may be y) and err are optional; count gets the completed refits
// (passes for the least-absolute-residual line). With bounds every fit is the bounded line (the
// bisquare mse then squares the residual) and the medians are clamped into the box; n <= 2 is
// the bounded line itself.
Status BisquareLine(const double* x, const double* y, const double* w, int32_t n, double tolerance,
                    int32_t limit, double* slope, double* intercept, double* fit, double* mse, int32_t* count,
                    const LineBounds* bounds = nullptr);
Status LarLine(const double* x, const double* y, const double* w, int32_t n, double tolerance, double floor,
               int32_t limit, double* slope, double* intercept, double* fit, double* mae, int32_t* count,
               const LineBounds* bounds = nullptr);

// The robust loops around the nonlinear models.
enum class RobustModel { Exp, Power, Log, Gauss };
enum class RobustKind { Bisquare, Lar };

struct RobustModelInputs {
    RobustModel model;
    RobustKind kind;
    int32_t method;       // exponential only
    const double* guess;  // parameter count long, or null
    double base;          // logarithm only
    double tolerance;
    double floor;
    int32_t limit;
};

// p has 2 (a, b) or 3 (a, c, s) parameters. fit (may be y) and err optional; count gets the
// completed refits.
Status RobustModelFit(const double* x, const double* y, const double* w, int32_t n, RobustModelInputs in,
                      double* p, double* fit, double* err, int32_t* count);

}  // namespace tw
