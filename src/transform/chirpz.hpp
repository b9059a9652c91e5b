// Chirp-Z transform y[j] = sum over k of x[k] A^(-k) W^(jk), j below m, and its inverse.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// A and W must be finite (else NanInfErr) and not zero (else DegenerateDataErr). Every power z^t
// is (|z|^2)^(t/2) (cos t theta, sin t theta) with theta the principal argument of z.
// Method 0 sums directly, each power of W taken afresh; method 1 is Bluestein's, one complex
// convolution of n + m chirp values. T is double or cdouble.
template <class T>
Status ChirpZ(const T* x, int32_t n, cdouble A, cdouble W, int32_t m, int32_t method, cdouble* y);

// The m samples (m at most n) whose chirp-Z of n points is x: the Vandermonde system of the first m
// nodes W^j, solved through the node polynomial (built in Leja order) and one forward chirp-Z
// with the ratio 1/W. Coinciding nodes give DivideByZeroErr.
Status InverseChirpZ(const cdouble* x, int32_t n, cdouble A, cdouble W, int32_t m, cdouble* y);

}  // namespace tw
