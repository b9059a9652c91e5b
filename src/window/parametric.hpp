// The windows that are not cosine sums. Each multiplies x[0..n-1] in place; all but the cosine
// taper (symmetric about (n-1)/2) and the symmetric forms of Gaussian and Dolph-Chebyshev are
// periodic, symmetric about n/2. n = 1 leaves x alone.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

template <class T>
Status TriangleWindow(T* x, int32_t n);
template <class T>
Status BartlettHannWindow(T* x, int32_t n);
template <class T>
Status BohmanWindow(T* x, int32_t n);
template <class T>
Status ParzenWindow(T* x, int32_t n);
template <class T>
Status WelchWindow(T* x, int32_t n);
template <class T>
Status KaiserWindow(T* x, int32_t n, double beta);
// symmetric 0: periodic with the scale (n+1) sigma; otherwise symmetric with the scale n sigma.
template <class T>
Status GaussianWindow(T* x, int32_t n, double sigma, int32_t symmetric);
// Keeps the first duty percent of the samples and zeroes the rest.
template <class T>
Status ForceWindow(T* x, int32_t n, double duty);
// Decays from 1 at x[0] to the final value at x[n-1].
template <class T>
Status ExponentialWindow(T* x, int32_t n, double final);
// Sine-squared tapers over fraction / 2 of the samples at each end.
template <class T>
Status CosineTaper(T* x, int32_t n, double fraction);

// I0(t) by its power series cut off after a term of at most 1e-8 or 25 terms.
double KaiserBesselI0(double t);

}  // namespace tw
