// Distribution functions and their inverses, for the exports and for the confidence bounds and
// analyses of variance that need critical values.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// Abramowitz and Stegun 26.2.16: absolute error below about 1e-5.
double NormalCdf(double x);
// Abramowitz and Stegun 26.2.23: absolute error below about 4.5e-4.
Status NormalQuantile(double p, double* x);

Status StudentTCdf(double t, int32_t df, double* p);
Status FisherCdf(double f, int32_t numeratorDf, int32_t denominatorDf, double* p);
// The same without the argument checks, for statistics that may come out NaN or infinite:
// NaN gives NaN and +Infinity gives 1. Both degrees must be at least 1.
double FisherCdfValue(double f, int32_t numeratorDf, int32_t denominatorDf);
Status ChiSquareCdf(double x, int32_t df, double* p);

// Bisections to a bracket of width 1e-4; the result is the bracket's lower end.
Status StudentTQuantile(double p, int32_t df, double* t);
Status FisherQuantile(double p, int32_t numeratorDf, int32_t denominatorDf, double* f);
Status ChiSquareQuantile(double p, int32_t df, double* x);

}  // namespace tw
