// Blocks the routines of the port repeat word for word in the published package, written once.
// Each keeps the published arithmetic in its order, so the routines that call it compute the same
// bits as when the block stood inline.
#pragma once

#include <cmath>

#include "special/amos/amos.hpp"

namespace tw::amos {

// The three scales of a recurrence kept on range near the exponent extremes: cssr multiplies in,
// csrr takes it out again, bry holds the magnitudes at which the next scale takes over.
inline void ScaleTriplets(double tol, double* cssr, double* csrr, double* bry) {
    const double cscl = 1.0 / tol;
    const double crsc = tol;
    cssr[0] = cscl;
    cssr[1] = 1.0;
    cssr[2] = crsc;
    csrr[0] = crsc;
    csrr[1] = 1.0;
    csrr[2] = cscl;
    bry[0] = 1.0e+3 * kD1Mach1 / tol;
    bry[1] = 1.0 / bry[0];
    bry[2] = kD1Mach2;
}

// rz = 2 / z.
inline void TwoOverZ(double zr, double zi, double* rzr, double* rzi) {
    const double raz = 1.0 / zabs(zr, zi);
    const double str = zr * raz;
    const double sti = -zi * raz;
    *rzr = (str + str) * raz;
    *rzi = (sti + sti) * raz;
}

// The zeta2 of a uniform expansion as the exponent zeta1 - zeta2 uses it. With kode 2 the factor
// exp(-zb) is taken out: zeta2 - zb, written fn^2 / (zb + zeta2) to avoid the cancellation.
inline void ExponentZeta2(int kode, double zbr, double zbi, double zeta2r, double zeta2i, double fn,
                          double* str, double* sti) {
    if (kode != 1) {
        double ar = zbr + zeta2r;
        double ai = zbi + zeta2i;
        const double rast = fn / zabs(ar, ai);
        ar = ar * rast * rast;
        ai = -ai * rast * rast;
        *str = ar;
        *sti = ai;
    } else {
        *str = zeta2r;
        *sti = zeta2i;
    }
}

// Over- and underflow test of a term exp(s1) * (the rest). rs1 = Re s1, refined near the limits by
// refine(rs1), the log of the rest's modulus added; false when it passes elim (the caller decides
// by the sign of rs1). On the first member of a sequence it also picks the scale: 1 near
// underflow, 3 near overflow, 2 between.
template <class Refine>
inline bool ExponentInRange(double s1r, double elim, double alim, bool first, int* flag, double* rs1,
                            Refine refine) {
    *rs1 = s1r;
    if (std::fabs(*rs1) > elim) return false;
    if (first) *flag = 2;
    if (std::fabs(*rs1) >= alim) {
        *rs1 = refine(*rs1);
        if (std::fabs(*rs1) > elim) return false;
        if (first) *flag = 1;
        if (*rs1 >= 0.0) {
            if (first) *flag = 3;
        }
    }
    return true;
}

// s2 = s2 * exp(s1) * css.
inline void TimesScaledExp(double s1r, double s1i, double css, double* s2r, double* s2i) {
    const double str = std::exp(s1r) * css;
    const double er = str * std::cos(s1i);
    const double ei = str * std::sin(s1i);
    const double pr = *s2r * er - *s2i * ei;
    *s2i = *s2r * ei + *s2i * er;
    *s2r = pr;
}

}  // namespace tw::amos
