/* Curve fitting: least squares (line, polynomial, general design matrix), goodness of fit and the
 * nonlinear models. x, y and weights are 1-D f64 handles of equal length n; weights of length 0
 * mean unweighted. Exports marked "y in, fit out" overwrite y with the fitted values and shrink it
 * on failure. The mse is always sum(((f - 2y) f + y y) |w|) / n. Polynomial coefficients ascend. */
#ifndef TWANLYS_FIT_H
#define TWANLYS_FIT_H

#include "twanlys/types.h"

/* Straight line y = slope x + intercept; y in, fit out. */
TW_API int32_t LinFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double* slope,
                           double* intercept, double* mse);
TW_API int32_t LinFitCoef_head(Array1DHandle y, Array1DHandle x, double* slope, double* intercept,
                               int32_t* status);
TW_API int32_t LinFitCoef80_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double* slope,
                                 double* intercept, int32_t* status);

/* method is that of GenLSFit_head. Fixed terms: powers (i32) and their values (f64). Orders above
 * 25 fit at most 26 terms and return +20031 with the coefficients above 0. */
TW_API int32_t PolyFit_head(Array1DHandle x, Array1DHandle y, int32_t order, int32_t method, Array1DHandle bestFit,
                            Array1DHandle coefficients, double* mse);
TW_API int32_t PolyFit80_head(Array1DHandle x, Array1DHandle y, int32_t order, int32_t method,
                              Array1DHandle fixedPowers, Array1DHandle fixedValues, Array1DHandle bestFit,
                              Array1DHandle coefficients, double* mse);
TW_API int32_t PolyFit81_head(Array1DHandle x, Array1DHandle y, int32_t order, Array1DHandle weights,
                              int32_t method, Array1DHandle fixedPowers, Array1DHandle fixedValues,
                              Array1DHandle bestFit, Array1DHandle coefficients, double* mse);

/* h is n by k (2-D f64). method: 0 SVD, 1-3 QR, 4 normal equations by LU, 5 by Cholesky, 6 SVD
 * with cut-off n s0 eps. GenLSFit_head takes standard deviations s (weight 1 / s^2, s = 0 is
 * weight 1), GenLSFit80_head weights. The covariance is k by k when wanted, else 0 by 0. */
TW_API int32_t GenLSFit_head(Array2DHandle h, Array1DHandle y, Array1DHandle deviations, int32_t method,
                             int32_t covarianceWanted, Array1DHandle coefficients, Array1DHandle bestFit,
                             Array2DHandle covariance, double* mse);
TW_API int32_t GenLSFit80_head(Array2DHandle h, Array1DHandle y, Array1DHandle weights, int32_t method,
                               int32_t covarianceWanted, Array1DHandle coefficients, Array1DHandle bestFit,
                               Array2DHandle covariance, double* mse);

/* dof below 1 means n - 2. */
TW_API int32_t GoodnessOfFit_head(Array1DHandle y, Array1DHandle fitted, Array1DHandle weights, int32_t dof,
                                  double* sse, double* rSquared, double* rmse);

/* Models a exp(b x), a x^b, a log_base(b x) and a exp(-0.5 ((x - c) / s)^2). tolerance is the
 * relative mse change that ends an iteration (not above 0: 1e-4), floor the mse that ends it (not
 * above 0: 1e-12), iterations the limit in and the steps taken out. A guess of length 0 is
 * estimated; another length than the parameter count returns +20010. Exponential method: 0
 * log-linear estimate, 1 Gauss-Newton refinement. */
TW_API int32_t ExpFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle deviations, double* a, double* b,
                           double* mse);
TW_API int32_t ExpFitCoef_head(Array1DHandle y, Array1DHandle x, double* a, double* b);
TW_API int32_t ExpFit80_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                             Array1DHandle guess, uint16_t method, double* a, double* b, double* mse,
                             int32_t* iterations, double floor);
TW_API int32_t ExpFitCoef80_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, int32_t method,
                                 double tolerance, Array1DHandle guess, double* a, double* b, int32_t* iterations,
                                 double floor);
TW_API int32_t PowerFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                             Array1DHandle guess, double* a, double* b, double* mse, int32_t* iterations,
                             double floor);
TW_API int32_t PowerFitCoef_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                 Array1DHandle guess, double* a, double* b, int32_t* iterations, double floor);
/* base 2.71828 exactly means ln, 10 log10. */
TW_API int32_t LogFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double* a,
                           double* b, double* mse);
TW_API int32_t LogFitCoef_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double* a,
                               double* b);
TW_API int32_t GaussianPeakFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                    Array1DHandle guess, double* amplitude, double* centre, double* deviation,
                                    double* mse, int32_t* iterations, double floor);
TW_API int32_t GaussianPeakFitCoef_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                        Array1DHandle guess, double* amplitude, double* centre, double* deviation,
                                        int32_t* iterations, double floor);

/* ---- Confidence and prediction bounds ---------------------------------------------------------
 * Bands of a model at given parameters (from any fit), by linearisation: C is the pseudo-inverse
 * of sum |w| J^T J, s2 = sum(((f - 2y) f + y y) |w|) / (n - p), t the Student t quantile at
 * 1 - (1 - level) / 2 with n - p degrees of freedom. Confidence band f +/- sqrt(J C J^T s2) t;
 * prediction band f +/- sqrt((J C J^T + 1 / |w|) s2) t (1 in place of 1 / |w| unweighted). The
 * confidence exports also give parameter intervals: delta_j = sqrt(C_jj) t sqrt(s2), upper and
 * lower parameters the parameters plus and minus their deltas (the line's slope first). Curves
 * are resized to n, parameter outputs to the parameter count. level lies in (0, 1); the models
 * take at least 3 samples (the Gaussian 4, the polynomial more than its coefficient count). On
 * failure the arrays shrink and the delta scalars are 0. Model values and the logarithm base rule
 * are those of the fits above. */
TW_API int32_t ConfBndLinear_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                                  double level, Array1DHandle upper, Array1DHandle lower, Array1DHandle upperParams,
                                  Array1DHandle lowerParams, double* deltaA, double* deltaB);
TW_API int32_t ConfBndExp_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                               double level, Array1DHandle upper, Array1DHandle lower, Array1DHandle upperParams,
                               Array1DHandle lowerParams, double* deltaA, double* deltaB);
TW_API int32_t ConfBndPower_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                                 double level, Array1DHandle upper, Array1DHandle lower, Array1DHandle upperParams,
                                 Array1DHandle lowerParams, double* deltaA, double* deltaB);
TW_API int32_t ConfBndLog_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double a,
                               double b, double level, Array1DHandle upper, Array1DHandle lower,
                               Array1DHandle upperParams, Array1DHandle lowerParams, double* deltaA,
                               double* deltaB);
TW_API int32_t ConfBndGauss_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double amplitude,
                                 double centre, double deviation, double level, Array1DHandle upper,
                                 Array1DHandle lower, Array1DHandle upperParams, Array1DHandle lowerParams,
                                 double* deltaAmplitude, double* deltaCentre, double* deltaDeviation);
/* The polynomial confidence band takes C from the SVD of the sqrt|w|-scaled Vandermonde matrix
 * without a cut-off, and its deltas are sqrt(C_jj s2) t. */
TW_API int32_t ConfBndPoly_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, Array1DHandle coefficients,
                                double level, Array1DHandle upper, Array1DHandle lower, Array1DHandle upperCoefficients,
                                Array1DHandle lowerCoefficients, Array1DHandle deltaCoefficients);
TW_API int32_t PredBndLinear_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                                  double level, Array1DHandle upper, Array1DHandle lower);
TW_API int32_t PredBndExp_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                               double level, Array1DHandle upper, Array1DHandle lower);
TW_API int32_t PredBndPower_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double a, double b,
                                 double level, Array1DHandle upper, Array1DHandle lower);
TW_API int32_t PredBndLog_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double a,
                               double b, double level, Array1DHandle upper, Array1DHandle lower);
TW_API int32_t PredBndGauss_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double amplitude,
                                 double centre, double deviation, double level, Array1DHandle upper,
                                 Array1DHandle lower);
TW_API int32_t PredBndPoly_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, Array1DHandle coefficients,
                                double level, Array1DHandle upper, Array1DHandle lower);

/* Robust fits. Bisquare (Bi..., GenBisquareFit...): reweighted least squares with Tukey's biweight
 * on leverage-adjusted residuals; the error output is the mse at the final parameters with the
 * caller's |w|. Least absolute residual (LAR..., GenLARFit_head): the error output is the mean of
 * |(y - f) w|. tolerance (not above 0: 1e-4) ends the loop on a relative change, floor (not above
 * 0: 1e-12) ends a least-absolute-residual loop, iterations is the limit in and the completed
 * refits out (GenLARFit_head and LARPolyFit_head only read it). coefficientsOnly non-zero: y stays
 * as passed, no error output, and the polynomial exports leave the best fit as passed. */
TW_API int32_t BiLinearFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                double* slope, double* intercept, double* mse, int32_t* iterations,
                                int32_t coefficientsOnly);
TW_API int32_t LARLinearFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                 double* slope, double* intercept, double* mae, int32_t* iterations, double floor,
                                 int32_t coefficientsOnly);
TW_API int32_t BiPolyFit_head(Array1DHandle x, Array1DHandle y, int32_t order, Array1DHandle weights, int32_t method,
                              Array1DHandle fixedPowers, Array1DHandle fixedValues, Array1DHandle bestFit,
                              Array1DHandle coefficients, double* mse, double tolerance, int32_t* iterations,
                              int32_t coefficientsOnly);
TW_API int32_t LARPolyFit_head(Array1DHandle x, Array1DHandle y, int32_t order, Array1DHandle weights, int32_t method,
                               Array1DHandle fixedPowers, Array1DHandle fixedValues, Array1DHandle bestFit,
                               Array1DHandle coefficients, double* mae, double tolerance, int32_t* iterations,
                               double floor, int32_t coefficientsOnly);
TW_API int32_t BiExpFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                             Array1DHandle guess, uint16_t method, double* a, double* b, double* mse,
                             int32_t* iterations, double floor, int32_t coefficientsOnly);
TW_API int32_t LARExpFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                              Array1DHandle guess, uint16_t method, double* a, double* b, double* mae,
                              int32_t* iterations, double floor, int32_t coefficientsOnly);
TW_API int32_t BiPowerFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                               Array1DHandle guess, double* a, double* b, double* mse, int32_t* iterations,
                               double floor, int32_t coefficientsOnly);
TW_API int32_t LARPowerFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                Array1DHandle guess, double* a, double* b, double* mae, int32_t* iterations,
                                double floor, int32_t coefficientsOnly);
TW_API int32_t BiLogFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double tolerance,
                             double* a, double* b, double* mse, int32_t* iterations, int32_t coefficientsOnly);
TW_API int32_t LARLogFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double base, double tolerance,
                              double* a, double* b, double* mae, int32_t* iterations, double floor,
                              int32_t coefficientsOnly);
TW_API int32_t BiGaussFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                               Array1DHandle guess, double* amplitude, double* centre, double* deviation, double* mse,
                               int32_t* iterations, double floor, int32_t coefficientsOnly);
TW_API int32_t LARGaussFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                Array1DHandle guess, double* amplitude, double* centre, double* deviation,
                                double* mae, int32_t* iterations, double floor, int32_t coefficientsOnly);
/* h is n by k; weights of length 0 or n. GenBisquareFit_Weight_head hands back the last refit's
 * weights (robust times |w|) in weights, filled with 1.0 first when it came empty. */
TW_API int32_t GenBisquareFit_head(Array2DHandle h, Array1DHandle y, Array1DHandle weights, int32_t method,
                                   int32_t covarianceWanted, double tolerance, int32_t* iterations,
                                   Array1DHandle coefficients, Array1DHandle bestFit, Array2DHandle covariance,
                                   double* mse);
TW_API int32_t GenBisquareFit_Weight_head(Array2DHandle h, Array1DHandle y, Array1DHandle weights, int32_t method,
                                          int32_t covarianceWanted, double tolerance, int32_t* iterations,
                                          Array1DHandle coefficients, Array1DHandle bestFit, Array2DHandle covariance,
                                          double* mse);
TW_API int32_t GenLARFit_head(Array2DHandle h, Array1DHandle y, Array1DHandle weights, int32_t method,
                              int32_t covarianceWanted, double tolerance, double floor, int32_t* iterations,
                              Array1DHandle coefficients, Array1DHandle bestFit, Array2DHandle covariance,
                              double* mae);

/* Bounded fits: each parameter between lower and upper (arrays of equal length, at least the
 * parameter count, or both empty for no bounds; infinities mean no bound, equal bounds fix the
 * parameter). Models a exp(b x) + c, a x^b + c, a exp(-0.5 ((x - m) / s)^2) + o, a log_base(b x)
 * and a x + b. errorKind: 0 least squares, 1 least absolute residual, 2 bisquare. y in, fit out.
 * iterations is read only (0 is written for empty data). A limit reached without convergence
 * returns -20062 with the outputs standing. */
TW_API int32_t BoundExpFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                int32_t* iterations, Array1DHandle guess, Array1DHandle lower, Array1DHandle upper,
                                uint16_t errorKind, double* a, double* b, double* c, double* mse);
TW_API int32_t BoundPowerFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                  int32_t* iterations, Array1DHandle guess, Array1DHandle lower, Array1DHandle upper,
                                  uint16_t errorKind, double* a, double* b, double* c, double* mse);
TW_API int32_t BoundGaussianFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                     int32_t* iterations, Array1DHandle guess, Array1DHandle lower,
                                     Array1DHandle upper, uint16_t errorKind, double* amplitude, double* centre,
                                     double* deviation, double* offset, double* mse);
TW_API int32_t BoundLogFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                int32_t* iterations, Array1DHandle guess, Array1DHandle lower, Array1DHandle upper,
                                uint16_t errorKind, double base, double* a, double* b, double* mse);
TW_API int32_t BoundLinearFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, Array1DHandle lower,
                                   Array1DHandle upper, double* slope, double* intercept, double* mse);
TW_API int32_t BoundLinearFitBi_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                     int32_t* iterations, Array1DHandle lower, Array1DHandle upper, double* slope,
                                     double* intercept, double* mse);
TW_API int32_t BoundLinearFitLAR_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, double tolerance,
                                      int32_t* iterations, Array1DHandle lower, Array1DHandle upper, double* slope,
                                      double* intercept, double* mae);
/* One damped step for a host-side iteration: coefficients += (alpha with its diagonal times
 * (lambda + 1))^-1 beta; alpha k by k, beta k. The status is stored through status and returned. */
TW_API int32_t GetNewCoef_head(Array1DHandle coefficients, Array2DHandle alpha, Array1DHandle beta, double* lambda,
                               int32_t* status);

/* ---- Splines, interpolation and outlier removal -----------------------------------------------
 * Interpolating cubic spline: Spline_head gives the second derivatives y2 of the spline through
 * (x, y), x ascending or descending without repeats; an end slope at or above 9.9e29 makes that
 * end natural. SpInterp_head evaluates the table at xi (end intervals extrapolate); it takes
 * pointers to the three handles. Status through the last argument, result 0; the f64 results are
 * NaN on failure. */
TW_API int32_t Spline_head(Array1DHandle y, Array1DHandle x, double* startSlope, double* endSlope, Array1DHandle y2,
                           int32_t* status);
TW_API int32_t SpInterp_head(Array1DHandle* y, Array1DHandle* x, Array1DHandle* y2, double* xi, double* yi,
                             int32_t* status);
/* The polynomial (Neville) or diagonal rational function (Bulirsch-Stoer) through all points at
 * xi, with the last tableau correction as error estimate. */
TW_API int32_t PolyInterp_head(Array1DHandle y, Array1DHandle x, double* xi, double* yi, double* errorEstimate,
                               int32_t* status);
TW_API int32_t RatInterp_head(Array1DHandle y, Array1DHandle x, double* xi, double* yi, double* errorEstimate,
                              int32_t* status);
/* Cubic smoothing spline; y in, fit out. smoothness 1 interpolates, 0 gives the least-squares
 * line, outside 0..1 means 8 / (8 + ((x[n-1] - x[0]) / n)^3). weights of length n or 0, balance
 * (per interval) of n - 1 or 0. error is p sum (y - f)^2, unweighted, plus (1 - p) times the
 * integral of the squared second derivative of the fit (each interval's share times |balance|). */
TW_API int32_t CubicSplineFit_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, Array1DHandle balance,
                                   double smoothness, double* error);
/* Least-squares B-spline curve of the given degree with m control points through the n by c data
 * (in, fit out). parameters (n, non-descending) or parameterisation 0 uniform, 1 chord length,
 * 2 centripetal; clamped knots averaged over the parameters. control points m by c out. */
TW_API int32_t BSplineFit_head(Array2DHandle data, Array1DHandle weights, Array1DHandle parameters, int32_t degree,
                               int32_t controlCount, uint16_t parameterisation, Array2DHandle controlPoints,
                               double* mse);
/* Outlier removal. Range selector 0 limits y, 1 limits x, 2 both (range x pair then y pair); the
 * limits of a pair in either order. Only values strictly between the limits stay, except that a y
 * equal to the high limit of selector 2 stays; NaN samples leave. The kept samples are copied in
 * order (weights kept empty without weights); the removed sample numbers (0-based) or the mask
 * (u8, 1 = removed) come out too. */
TW_API int32_t RmvOutlierRng_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, Array1DHandle range,
                                  uint16_t selector, Array1DHandle yKept, Array1DHandle xKept, Array1DHandle weightsKept,
                                  Array1DHandle removed);
TW_API int32_t RmvOutlierIndx_head(Array1DHandle y, Array1DHandle x, Array1DHandle weights, Array1DHandle indices,
                                   Array1DHandle yKept, Array1DHandle xKept, Array1DHandle weightsKept,
                                   Array1DHandle mask);

#endif
