// Confidence and prediction bounds of a fitted model, by linearisation at given parameters: the
// Jacobian rows J(x) of the model, C the pseudo-inverse of sum |w| J^T J, the residual variance s2
// over n - p degrees of freedom and a Student t quantile.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

enum class BoundModel : int32_t { Line, Exp, Power, Log, Gauss, Poly };

// A model and its parameters in the order of the exports' arguments: the line (slope, intercept),
// the exponential, power and logarithm (a, b), the Gaussian (amplitude, centre, deviation), the
// polynomial its count ascending coefficients. base is read by the logarithm only.
struct BoundModelParams {
    BoundModel kind;
    const double* params;
    int32_t count;
    double base;
};

// Parameter count of a fixed model (the polynomial's is its coefficient count).
constexpr int32_t BoundParameterCount(BoundModel m) { return m == BoundModel::Gauss ? 3 : 2; }

// The band f +/- d at the n samples into upper and lower. The confidence band (prediction false)
// also gives the parameter intervals, count values each in argument order: upperParams,
// lowerParams and delta may each be null. Weights are used as |w|, or null.
Status FitBoundsCore(const BoundModelParams& m, const double* x, const double* y, const double* w, int32_t n,
                     double level, bool prediction, double* upper, double* lower, double* upperParams,
                     double* lowerParams, double* delta);

}  // namespace tw
