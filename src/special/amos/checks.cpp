// Underflow checks shared by the continuation and uniform-expansion routines, after Amos, TOMS 644.
#include "special/amos/amos.hpp"

namespace tw::amos {

// y comes scaled up by 1/tol; nz = 1 when its smaller part is at or below ascle and the larger is
// within 1/tol of it, so that scaling back by tol would underflow.
void zuchk(double yr, double yi, int* nz, double ascle, double tol) {
    *nz = 0;
    const double wr = std::fabs(yr);
    const double wi = std::fabs(yi);
    double st = std::fmin(wr, wi);
    if (st > ascle) return;
    const double ss = std::fmax(wr, wi);
    st = st / tol;
    if (ss < st) *nz = 1;
}

// For the analytic continuation I(z) = s1 exp(-2z) + s2 (scaled): s1 exp(-2z) is formed through
// logarithms so it underflows to zero cleanly; nz = 1 when both terms are then below ascle.
void zs1s2(double zrr, double zri, double* s1r, double* s1i, double* s2r, double* s2i, int* nz, double ascle,
           double alim, int* iuf) {
    namespace d = data::zs1s2;
    *nz = 0;
    double as1 = zabs(*s1r, *s1i);
    const double as2 = zabs(*s2r, *s2i);
    if ((*s1r != 0.0 || *s1i != 0.0) && as1 != 0.0) {
        const double aln = -zrr - zrr + std::log(as1);
        const double s1dr = *s1r;
        const double s1di = *s1i;
        *s1r = d::ZEROR;
        *s1i = d::ZEROI;
        as1 = d::ZEROR;
        if (aln >= -alim) {
            double c1r = 0.0, c1i = 0.0;
            int idum = 0;
            zlog(s1dr, s1di, &c1r, &c1i, &idum);
            c1r = c1r - zrr - zrr;
            c1i = c1i - zri - zri;
            zexp(c1r, c1i, s1r, s1i);
            as1 = zabs(*s1r, *s1i);
            *iuf = *iuf + 1;
        }
    }
    const double aa = std::fmax(as1, as2);
    if (aa > ascle) return;
    *s1r = d::ZEROR;
    *s1i = d::ZEROI;
    *s2r = d::ZEROR;
    *s2i = d::ZEROI;
    *nz = 1;
    *iuf = 0;
}

}  // namespace tw::amos
