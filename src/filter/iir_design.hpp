// IIR design by analog prototype, frequency substitution and the prewarped bilinear transform,
// delivered as cascades of second-order (form 0) or fourth-order (form 1) sections.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

enum class IirPrototype { Butterworth, Chebyshev, InvChebyshev, Elliptic, Bessel };

struct IirParams {
    IirPrototype prototype;
    double fs, fl, fh;
    double ripple;       // dB, Chebyshev and elliptic
    double attenuation;  // dB, inverse Chebyshev and elliptic
    int32_t order;       // >= 1
    int32_t type;        // 0 lowpass, 1 highpass, 2 bandpass, 3 bandstop
    int32_t form;        // 0 or 1
};

// Lengths of a and b. Types other than 2 and 3 count as lowpass and forms other than 1 as 0, so
// that the sizes exist before the selectors are judged. False when they exceed the i32 range.
bool IirDesignSizes(int32_t order, int32_t type, int32_t form, int32_t* na, int32_t* nb);

// The checks after sizing, in their order: cut-offs, attenuation (inverse Chebyshev), Nyquist,
// ripple and attenuation (Chebyshev, elliptic), selectors.
Status IirDesignCheck(const IirParams& params);

// The cascade into a and b of the lengths above. The parameters must have passed IirDesignCheck.
Status IirDesign(const IirParams& params, double* a, double* b);

// Elliptic helpers, exposed for tests. K of complementary modulus c; sn, cn, dn of u with
// complementary modulus c; the inverse of sc(., k) at y.
double EllipticKOfComplement(double c);
void JacobiSnCnDn(double u, double c, double* sn, double* cn, double* dn);
double InverseSc(double y, double k);

}  // namespace tw
