// ln Gamma for positive arguments, after Amos, TOMS 644 (DGAMLN): the table below 101 at the
// integers, otherwise the Stirling series after shifting the argument up to ZMIN.
#include "special/amos/amos.hpp"

namespace tw::amos {

double dgamln(double z, int* ierr) {
    namespace d = data::dgamln;
    *ierr = 0;
    if (z <= 0.0) {
        *ierr = 1;
        return kD1Mach2;
    }
    int nz = 0;
    // A NaN takes the series (and comes back NaN) rather than being truncated to an integer.
    if (z <= 101.0) {
        nz = static_cast<int>(z);
        const double fz = z - static_cast<double>(nz);
        if (fz <= 0.0 && nz <= 100) return d::GLN[nz - 1];
    }
    double wdtol = kD1Mach4;
    wdtol = std::fmax(wdtol, 0.5e-18);
    const int i1m = kI1Mach14;
    const double rln = kD1Mach5 * static_cast<double>(i1m);
    double fln = std::fmin(rln, 20.0);
    fln = std::fmax(fln, 3.0);
    fln = fln - 3.0;
    const double zm = 1.8000 + 0.3875 * fln;
    const int mz = static_cast<int>(zm + 1.0);
    const double zmin = static_cast<double>(mz);
    double zdmy = z;
    double zinc = 0.0;
    if (z < zmin) {
        zinc = zmin - static_cast<double>(nz);
        zdmy = z + zinc;
    }
    double zp = 1.0 / zdmy;
    const double t1 = d::CF[0] * zp;
    double s = t1;
    if (zp >= wdtol) {
        const double zsq = zp * zp;
        const double tst = t1 * wdtol;
        for (int k = 2; k <= 22; ++k) {
            zp = zp * zsq;
            const double trm = d::CF[k - 1] * zp;
            if (std::fabs(trm) < tst) break;
            s = s + trm;
        }
    }
    if (zinc == 0.0) {
        const double tlg = std::log(z);
        return z * (tlg - 1.0) + 0.5 * (d::CON - tlg) + s;
    }
    zp = 1.0;
    nz = static_cast<int>(zinc);
    for (int i = 1; i <= nz; ++i) zp = zp * (z + static_cast<double>(i - 1));
    const double tlg = std::log(zdmy);
    return zdmy * (tlg - 1.0) - std::log(zp) + 0.5 * (d::CON - tlg) + s;
}

}  // namespace tw::amos
