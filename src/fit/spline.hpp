// Splines, interpolation and outlier removal on plain arrays. Scratch memory comes from the routed
// scratch allocator; every core returns its status with the releases merged in.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// A first derivative at or above this marks a natural end (second derivative 0).
inline constexpr double kNaturalEndThreshold = 9.9e29;
inline constexpr double kNaturalEnd = 1e30;

// --- Interpolating spline ------------------------------------------------------------------------

// Second derivatives y2 of the cubic spline through the n points (x ascending or descending; any
// zero neighbouring difference is NotAscendingErr), end slopes yp1 and ypn or natural ends. u is
// n elements of workspace, or null to take it from scratch.
Status SplineSecondDerivatives(const double* x, const double* y, int32_t n, double yp1, double ypn,
                               double* y2, double* u = nullptr);

// The spline value at xi from a table of n >= 1 points with its second derivatives; outside the
// table the end interval is extrapolated.
Status SplineValue(const double* x, const double* y, const double* y2, int32_t n, double xi, double* yi);

// --- Tableau interpolation -----------------------------------------------------------------------

// Polynomial through all n points at xi (Neville), and the last correction as error estimate.
Status PolyInterpCore(const double* x, const double* y, int32_t n, double xi, double* yi, double* dy);
// Diagonal rational function through all n points at xi (Bulirsch-Stoer).
Status RatInterpCore(const double* x, const double* y, int32_t n, double xi, double* yi, double* dy);

// --- Fitting splines ----------------------------------------------------------------------------

// Cubic smoothing spline of smoothness p (outside 0..1: chosen from the data span) written over y.
// w (n) and balance (n - 1) may be null. error gets the weighted data term plus the roughness.
Status SmoothingSplineCore(const double* x, double* y, const double* w, const double* balance, int32_t n,
                           double p, double* error);

// Least-squares B-spline of the given degree with m control points through the n by c row-major
// data (overwritten by the fit). w (n) and t (n parameter values) may be null; parameterisation 0
// uniform, 1 chord length, 2 centripetal. control gets m by c values.
Status BSplineFitCore(double* data, int32_t n, int32_t c, const double* w, const double* t, int32_t degree,
                      int32_t m, uint32_t parameterisation, double* control, double* mse);

// --- Outlier removal -----------------------------------------------------------------------------

// Limits of a range test: only values strictly between low and high stay, except that the y test
// of selector 2 keeps a value equal to high.
struct OutlierLimits {
    double low[2], high[2];  // [0] the y (selector 0) or x (1, 2) pair, [1] the y pair of selector 2
    uint32_t selector;
};

// The limits from range (count elements) by the selector: InvalidSelectorErr, TooFewSamples2Err,
// TooFewSamples4Err, NanInfErr.
Status ReadOutlierLimits(const double* range, int32_t count, uint32_t selector, OutlierLimits* limits);
// Marks each sample that leaves (flags[i] = 1) and returns the count of those that stay.
int32_t MarkOutliers(const double* y, const double* x, int32_t n, const OutlierLimits& limits,
                     uint8_t* flags);
// Marks the listed sample numbers; a number outside 0 .. n-1 is IndexRangeErr.
Status MarkIndices(const int32_t* list, int32_t count, int32_t n, uint8_t* flags);
// Copies the samples whose flag is 0 in order (w and wKept may be null); removed, if given, gets
// the numbers of the others.
void KeepSamples(const double* y, const double* x, const double* w, int32_t n, const uint8_t* flags,
                 double* yKept, double* xKept, double* wKept, int32_t* removed);

}  // namespace tw
