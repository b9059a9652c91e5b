#include "special/bessel.hpp"
#include "special/special2.hpp"
#include "special/special_frame.hpp"
#include "twanlys/special.h"

using namespace tw;

namespace {

void Store(double* out, double value) {
    if (out != nullptr) *out = value;
}

}  // namespace

TW_API void TW_Elliptic1(double m, double phi, double* out) {
    Store(out, IsNaN(phi) ? EllipticK(m) : EllipticF(phi, m));
}

TW_API void TW_Elliptic1_85(double m, double phi, double* out, int32_t selector) {
    Store(out, SelectsComplete(selector) ? EllipticK(m) : EllipticF(phi, m));
}

TW_API void TW_Elliptic2(double m, double phi, double* out) {
    Store(out, IsNaN(phi) ? EllipticE(m) : EllipticEInc(phi, m));
}

TW_API void TW_Elliptic2_85(double m, double phi, double* out, int32_t selector) {
    Store(out, SelectsComplete(selector) ? EllipticE(m) : EllipticEInc(phi, m));
}

TW_API void TW_EllipticJ(double u, double m, double* sn, double* cn, double* dn, double* phi) {
    double s, c, d;
    JacobiElliptic(u, m, &s, &c, &d, phi);
    Store(sn, s);
    Store(cn, c);
    Store(dn, d);
}
