// Bounded fits: a Levenberg-Marquardt solver with box constraints and three error kinds, the
// bounded models built on it, and the penalised-Newton straight line.
#pragma once

#include <cstdint>

#include "fit/fit_core.hpp"

namespace tw {

// Error kinds of the bounded fits.
enum BoundKind : uint16_t { BoundLeastSquares = 0, BoundLeastAbsolute = 1, BoundBisquare = 2 };

// A model for the solver: plain entries with a context, no global state. gradient and batch may
// be null: the gradient is then taken by central differences, the batch formed sample by sample.
struct LmModel {
    int32_t p;
    double (*value)(double x, const double* q, const void* ctx);
    void (*gradient)(double x, const double* q, const void* ctx, double* g);
    // alpha (p by p, full), beta (p) and the mean of r^2 |v| over all samples, v null meaning 1.
    void (*batch)(const double* x, const double* y, const double* v, int32_t n, const double* q,
                  const void* ctx, double* alpha, double* beta, double* mse);
    const void* ctx;
};

// Levenberg-Marquardt with box constraints on q (p values, in and out). upper and lower hold p
// bounds (infinities allowed). iterations: limit in (negative: none), steps out. lambda in and
// out. fit (n, may be null) and err get the model and the objective at the result (kind 2: the
// mse with |w|). Returns NoConvergenceErr with the outputs standing when the limit ends it.
Status LevenbergMarquardt(const double* x, const double* y, const double* w, int32_t n, uint16_t kind,
                          const LmModel& model, double* q, const double* upper, const double* lower,
                          int32_t* iterations, double tolerance, double* lambda, double* fit, double* err);

// The models of the bounded fits, parameters in their documented order.
enum class BoundModel { Exp, Power, Gauss };
LmModel BoundedModel(BoundModel m);
// a log_base(b x); ctx points to {base, ln base} and must outlive the model.
LmModel BoundedLogModel(const double* baseAndLog);

// Bounded exponential, power or Gaussian fit. guess (p, or null), iterations read only.
Status BoundedModelFit(BoundModel m, const double* x, const double* y, const double* w, int32_t n,
                       double tolerance, int32_t iterations, const double* guess, const double* lower,
                       const double* upper, uint16_t kind, double* q, double* fit, double* mse);
// Bounded logarithm: a plain (or robust) fit first, the solver only when it leaves the box.
Status BoundedLogFit(const double* x, const double* y, const double* w, int32_t n, double tolerance,
                     int32_t iterations, const double* lower, const double* upper, uint16_t kind, double base,
                     double* q, double* fit, double* mse);

// Bounds of a straight line: [0] slope, [1] intercept.
struct LineBounds {
    double lower[2];
    double upper[2];
};

// Least-squares line held in the box by a penalised Newton iteration. fit may be y. mse is the
// mean of (y - f)^2 |w|.
Status BoundedLine(const double* x, const double* y, const double* w, int32_t n, const LineBounds& b,
                   double* slope, double* intercept, double* fit, double* mse);

// One damped step: coef += (alpha with diagonal times (lambda + 1))^-1 beta.
Status DampedStep(double* coef, const double* alpha, const double* beta, int32_t k, double lambda);

}  // namespace tw
