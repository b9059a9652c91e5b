// Frame steps shared by the fitting exports.
#pragma once

#include "frame/frame.hpp"

namespace tw {

// x of n samples and weights of n or none; the views come back aligned.
inline Status ReadSamples(Frame& f, Handle x, Handle w, int32_t n, const double** xs, const double** ws) {
    *ws = nullptr;
    if (Count(x) != n) return EqSamplesErr;
    const int32_t nw = Count(w);
    if (nw != 0 && nw != n) return EqSamplesErr;
    Status s = f.In(x, xs);
    if (s == 0 && nw != 0) s = f.In(w, ws);
    return s;
}

// y as input only (coefficients only), or as input and best-fit output worked on in place.
inline Status ViewY(Frame& f, Handle& y, bool bestFit, const double** ys, double** fit) {
    *fit = nullptr;
    if (!bestFit) return f.In(y, ys);
    const Status s = f.InPlace(y, fit);
    *ys = *fit;
    return s;
}

}  // namespace tw
