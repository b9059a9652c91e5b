// The Dolph-Chebyshev window: equal side lobes at 1/s of the main lobe, built in the frequency
// domain and brought to the time domain by an inverse transform.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// The two inverse transforms the window needs. Any positive overall scale will do, since the
// window is normalised to its peak. v may be overwritten; out has room for N values.
struct ChebyshevTransforms {
    // N odd: v[0..h-1], h = (N+1)/2, is the real half of a real, even spectrum of length N
    // (imaginary parts 0). Writes the N samples of its inverse real DFT to out.
    Status (*inverseReal)(double* v, int32_t N, double* out);
    // Writes the inverse cosine transform (orthonormal type III) of v[0..h-1] to out[0..h-1].
    Status (*inverseCosine)(double* v, int32_t h, double* out);
};

// The library's transforms.
extern const ChebyshevTransforms kChebyshevTransforms;

// s is the ratio of the main lobe to the side lobes; below 1 it counts as 1. symmetric 0 gives
// the periodic form: the window of length n+1 without its last sample.
template <class T>
Status DolphChebyshevWindow(T* x, int32_t n, double s, int32_t symmetric,
                            const ChebyshevTransforms& transforms = kChebyshevTransforms);

}  // namespace tw
