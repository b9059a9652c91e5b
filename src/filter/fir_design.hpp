// Windowless FIR design and the narrowband (interpolated FIR) design built on the equiripple core.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// Truncated sinc of n taps for type 0 lowpass, 1 highpass, 2 bandpass, 3 bandstop (type already
// clamped). Checks the cut-offs after the caller has checked n and sized h.
Status TruncatedSincDesign(double fs, double fl, double fh, int32_t n, int32_t type, double* h);

// A finished narrowband design: the taps live in scratch blocks owned by the caller of
// NarrowbandDesign (released with ScratchFree).
struct NarrowbandStages {
    int32_t filterClass = 0;
    int32_t interpolation = 0;
    int32_t nModel = 0;
    int32_t nImage = 0;
    double* model = nullptr;
    double* image = nullptr;
};

// Edges: pass edge first, stop edge second (full widths for the band types); ripple linear,
// attenuation in dB.
Status NarrowbandDesign(double fs, double firstEdge, double secondEdge, double centre, double ripple,
                        double attenuation, int32_t type, NarrowbandStages* out);

}  // namespace tw
