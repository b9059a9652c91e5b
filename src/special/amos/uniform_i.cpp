// I for large order by the uniform asymptotic expansions, after Amos, TOMS 644: zuoik (the overflow
// and underflow pre-test), zuni1 (Debye expansion, |arg z| <= pi/3), zuni2 (Airy-type expansion,
// pi/3 < |arg z| <= pi/2) and zbuni (either one, with backward recurrence from a larger order).
#include <algorithm>

#include "special/amos/amos.hpp"
#include "special/amos/common.hpp"

namespace tw::amos {

namespace {

// zuoik's underflow test between -alim and -elim: rcz (Re of the exponent) refined by the log of
// the term's modulus, then the term itself, exp(cz) phi (arg^-1/4 for the Airy-type form) / tol,
// through zuchk. true when it underflows.
bool Underflows(double rcz, double czr, double czi, double phir, double phii, double argr, double argi,
                double aphi, double aarg, int iform, double tol, double elim) {
    namespace d = data::zuoik;
    rcz = rcz + std::log(aphi);
    if (iform == 2) rcz = rcz - 0.25 * std::log(aarg) - d::AIC;
    if (!(rcz > -elim)) return true;
    const double ascle = 1.0e+3 * kD1Mach1 / tol;
    double str = 0.0, sti = 0.0;
    int idum = 0;
    zlog(phir, phii, &str, &sti, &idum);
    czr = czr + str;
    czi = czi + sti;
    if (iform != 1) {
        zlog(argr, argi, &str, &sti, &idum);
        czr = czr - 0.25 * str - d::AIC;
        czi = czi - 0.25 * sti;
    }
    const double ax = std::exp(rcz) / tol;
    const double ay = czi;
    czr = ax * std::cos(ay);
    czi = ax * std::sin(ay);
    int nw = 0;
    zuchk(czr, czi, &nw, ascle, tol);
    return nw != 0;
}

// zbuni's rescaling: once st = s2 / csclr passes ascle, s1 and s2 move to the next scale, csclr
// taking another factor tol.
void RescaleBy(double tol, double str, double sti, const double* bry, int* iflag, double* ascle,
               double* csclr, double* cscrr, double* s1r, double* s1i, double* s2r, double* s2i) {
    if (*iflag >= 3) return;
    const double c1m = std::fmax(std::fabs(str), std::fabs(sti));
    if (c1m <= *ascle) return;
    *iflag = *iflag + 1;
    *ascle = bry[*iflag - 1];
    *s1r = *s1r * *cscrr;
    *s1i = *s1i * *cscrr;
    *csclr = *csclr * tol;
    *cscrr = 1.0 / *csclr;
    *s1r = *s1r * *csclr;
    *s1i = *s1i * *csclr;
    *s2r = str * *csclr;
    *s2i = sti * *csclr;
}

}  // namespace

void zuoik(double zr, double zi, double fnu, int kode, int ikflg, int n, double* yr, double* yi, int* nuf,
           double tol, double elim, double alim) {
    namespace d = data::zuoik;
    double cwrkr[16], cwrki[16];
    double phir = 0.0, phii = 0.0, argr = 0.0, argi = 0.0, zeta1r = 0.0, zeta1i = 0.0, zeta2r = 0.0,
           zeta2i = 0.0, asumr = 0.0, asumi = 0.0, bsumr = 0.0, bsumi = 0.0, sumr = 0.0, sumi = 0.0;
    double czr = 0.0, czi = 0.0, aarg = 0.0;
    int init = 0;
    *nuf = 0;
    int nn = n;
    double zrr = zr;
    double zri = zi;
    if (zr < 0.0) {
        zrr = -zr;
        zri = -zi;
    }
    const double zbr = zrr;
    const double zbi = zri;
    double ax = std::fabs(zr) * 1.7321;
    double ay = std::fabs(zi);
    const int iform = ay > ax ? 2 : 1;
    double gnu = std::fmax(fnu, 1.0);
    if (ikflg != 1) {
        const double fnn = static_cast<double>(nn);
        const double gnn = fnu + fnn - 1.0;
        gnu = std::fmax(gnn, fnn);
    }
    // The rotated argument for the Airy-type expansion (only used when iform = 2).
    double znr = zri;
    double zni = -zrr;
    if (zi <= 0.0) znr = -znr;
    if (iform != 2) {
        init = 0;
        zunik(zrr, zri, gnu, ikflg, 1, tol, &init, &phir, &phii, &zeta1r, &zeta1i, &zeta2r, &zeta2i, &sumr,
              &sumi, cwrkr, cwrki);
        czr = zeta2r - zeta1r;
        czi = zeta2i - zeta1i;
    } else {
        zunhj(znr, zni, gnu, 1, tol, &phir, &phii, &argr, &argi, &zeta1r, &zeta1i, &zeta2r, &zeta2i, &asumr,
              &asumi, &bsumr, &bsumi);
        czr = zeta2r - zeta1r;
        czi = zeta2i - zeta1i;
        aarg = zabs(argr, argi);
    }
    if (kode != 1) {
        czr = czr - zbr;
        czi = czi - zbi;
    }
    if (ikflg != 1) {
        czr = -czr;
        czi = -czi;
    }
    double aphi = zabs(phir, phii);
    double rcz = czr;
    // Overflow test.
    if (rcz > elim) {
        *nuf = -1;
        return;
    }
    if (rcz >= alim) {
        rcz = rcz + std::log(aphi);
        if (iform == 2) rcz = rcz - 0.25 * std::log(aarg) - d::AIC;
        if (rcz > elim) {
            *nuf = -1;
            return;
        }
    } else {
        // Underflow test.
        bool under = rcz < -elim;
        if (!under && rcz <= -alim)
            under = Underflows(rcz, czr, czi, phir, phii, argr, argi, aphi, aarg, iform, tol, elim);
        if (under) {
            ZeroSequence(nn, yr, yi);
            *nuf = nn;
            return;
        }
    }
    if (ikflg == 2 || n == 1) return;
    // Set underflows on I sequences, from the top order down.
    while (true) {
        gnu = fnu + static_cast<double>(nn - 1);
        if (iform != 2) {
            init = 0;
            zunik(zrr, zri, gnu, ikflg, 1, tol, &init, &phir, &phii, &zeta1r, &zeta1i, &zeta2r, &zeta2i,
                  &sumr, &sumi, cwrkr, cwrki);
            czr = zeta2r - zeta1r;
            czi = zeta2i - zeta1i;
        } else {
            zunhj(znr, zni, gnu, 1, tol, &phir, &phii, &argr, &argi, &zeta1r, &zeta1i, &zeta2r, &zeta2i,
                  &asumr, &asumi, &bsumr, &bsumi);
            czr = zeta2r - zeta1r;
            czi = zeta2i - zeta1i;
            aarg = zabs(argr, argi);
        }
        if (kode != 1) {
            czr = czr - zbr;
            czi = czi - zbi;
        }
        aphi = zabs(phir, phii);
        rcz = czr;
        bool under = rcz < -elim;
        if (!under) {
            if (rcz > -alim) return;
            if (!Underflows(rcz, czr, czi, phir, phii, argr, argi, aphi, aarg, iform, tol, elim)) return;
        }
        yr[nn - 1] = d::ZEROR;
        yi[nn - 1] = d::ZEROI;
        nn = nn - 1;
        *nuf = *nuf + 1;
        if (nn == 0) return;
    }
}

void zuni1(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, int* nlast,
           double fnul, double tol, double elim, double alim) {
    namespace d = data::zuni1;
    double bry[3], cwrkr[16], cwrki[16], cssr[3], csrr[3], cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0};
    double phir = 0.0, phii = 0.0, zeta1r = 0.0, zeta1i = 0.0, zeta2r = 0.0, zeta2i = 0.0, sumr = 0.0,
           sumi = 0.0;
    double str = 0.0, sti = 0.0, s1r = 0.0, s1i = 0.0, s2r = 0.0, s2i = 0.0, rs1 = 0.0;
    int iflag = 0, init = 0, nn = 0, nw = 0;
    *nz = 0;
    int nd = n;
    *nlast = 0;
    // Computed values with exponents between alim and elim in magnitude are scaled to keep
    // intermediate arithmetic on scale, exp(alim) = exp(elim)*tol.
    ScaleTriplets(tol, cssr, csrr, bry);
    // Check for underflow and overflow on the first member.
    double fn = std::fmax(fnu, 1.0);
    init = 0;
    zunik(zr, zi, fn, 1, 1, tol, &init, &phir, &phii, &zeta1r, &zeta1i, &zeta2r, &zeta2i, &sumr, &sumi, cwrkr,
          cwrki);
    ExponentZeta2(kode, zr, zi, zeta2r, zeta2i, fn, &str, &sti);
    s1r = str - zeta1r;
    s1i = sti - zeta1i;
    if (FirstMemberOutOfRange(s1r, elim, n, yr, yi, nz)) return;
L30:
    nn = std::min(2, nd);
    for (int i = 1; i <= nn; ++i) {
        fn = fnu + static_cast<double>(nd - i);
        init = 0;
        zunik(zr, zi, fn, 1, 0, tol, &init, &phir, &phii, &zeta1r, &zeta1i, &zeta2r, &zeta2i, &sumr, &sumi,
              cwrkr, cwrki);
        ExponentZeta2(kode, zr, zi, zeta2r, zeta2i, fn, &str, &sti);
        s1r = str - zeta1r;
        s1i = sti - zeta1i;
        if (kode != 1) s1i = s1i + zi;
        // Test for underflow and overflow.
        if (!ExponentInRange(s1r, elim, alim, i == 1, &iflag, &rs1,
                             [&](double r) { return r + std::log(zabs(phir, phii)); }))
            goto L110;
        // Scale s1 if |s1| < ascle.
        s2r = phir * sumr - phii * sumi;
        s2i = phir * sumi + phii * sumr;
        TimesScaledExp(s1r, s1i, cssr[iflag - 1], &s2r, &s2i);
        if (iflag == 1) {
            zuchk(s2r, s2i, &nw, bry[0], tol);
            if (nw != 0) goto L110;
        }
        cyr[i - 1] = s2r;
        cyi[i - 1] = s2i;
        const int m = nd - i + 1;
        yr[m - 1] = s2r * csrr[iflag - 1];
        yi[m - 1] = s2i * csrr[iflag - 1];
    }
    // Recur backward for the rest.
    if (nd > 2) RecurIBackward(zr, zi, fnu, nd, cyr, cyi, iflag, bry, cssr, csrr, yr, yi);
    return;
L110:
    // Set underflow and update parameters.
    if (rs1 > 0.0) {
        *nz = -1;
        return;
    }
    if (!DropUnderflowed(zr, zi, fnu, kode, tol, elim, alim, yr, yi, &nd, nz)) return;
    fn = fnu + static_cast<double>(nd - 1);
    if (fn >= fnul) goto L30;
    *nlast = nd;
}

void zuni2(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, int* nlast,
           double fnul, double tol, double elim, double alim) {
    namespace d = data::zuni2;
    double bry[3], cssr[3], csrr[3], cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0};
    double phir = 0.0, phii = 0.0, argr = 0.0, argi = 0.0, zeta1r = 0.0, zeta1i = 0.0, zeta2r = 0.0,
           zeta2i = 0.0, asumr = 0.0, asumi = 0.0, bsumr = 0.0, bsumi = 0.0;
    double str = 0.0, sti = 0.0, s1r = 0.0, s1i = 0.0, s2r = 0.0, s2i = 0.0, rs1 = 0.0;
    int iflag = 0, nn = 0, nw = 0;
    *nz = 0;
    int nd = n;
    *nlast = 0;
    // Computed values with exponents between alim and elim in magnitude are scaled to keep
    // intermediate arithmetic on scale, exp(alim) = exp(elim)*tol.
    ScaleTriplets(tol, cssr, csrr, bry);
    // zn is in the right half plane after rotation by ci or -ci.
    double znr = zi;
    double zni = -zr;
    const double zbr = zr;
    double zbi = zi;
    double cidi = -d::CONER;
    const int inu = static_cast<int>(fnu);
    const double ang = d::HPI * (fnu - static_cast<double>(inu));
    double c2r = std::cos(ang);
    double c2i = std::sin(ang);
    const double car = c2r;
    const double sar = c2i;
    int in = inu + n - 1;
    in = in % 4 + 1;
    str = c2r * d::CIPR[in - 1] - c2i * d::CIPI[in - 1];
    c2i = c2r * d::CIPI[in - 1] + c2i * d::CIPR[in - 1];
    c2r = str;
    if (zi <= 0.0) {
        znr = -znr;
        zbi = -zbi;
        cidi = -cidi;
        c2i = -c2i;
    }
    // Check for underflow and overflow on the first member.
    double fn = std::fmax(fnu, 1.0);
    zunhj(znr, zni, fn, 1, tol, &phir, &phii, &argr, &argi, &zeta1r, &zeta1i, &zeta2r, &zeta2i, &asumr,
          &asumi, &bsumr, &bsumi);
    ExponentZeta2(kode, zbr, zbi, zeta2r, zeta2i, fn, &str, &sti);
    s1r = str - zeta1r;
    s1i = sti - zeta1i;
    if (FirstMemberOutOfRange(s1r, elim, n, yr, yi, nz)) return;
L40:
    nn = std::min(2, nd);
    for (int i = 1; i <= nn; ++i) {
        fn = fnu + static_cast<double>(nd - i);
        zunhj(znr, zni, fn, 0, tol, &phir, &phii, &argr, &argi, &zeta1r, &zeta1i, &zeta2r, &zeta2i, &asumr,
              &asumi, &bsumr, &bsumi);
        ExponentZeta2(kode, zbr, zbi, zeta2r, zeta2i, fn, &str, &sti);
        s1r = str - zeta1r;
        s1i = sti - zeta1i;
        if (kode != 1) s1i = s1i + std::fabs(zi);
        // Test for underflow and overflow.
        if (!ExponentInRange(s1r, elim, alim, i == 1, &iflag, &rs1, [&](double r) {
                return r + std::log(zabs(phir, phii)) - 0.25 * std::log(zabs(argr, argi)) - d::AIC;
            }))
            goto L120;
        // Scale s1 to keep intermediate arithmetic on scale near exponent extremes.
        AiryTypeTerm(argr, argi, asumr, asumi, bsumr, bsumi, phir, phii, &s2r, &s2i);
        TimesScaledExp(s1r, s1i, cssr[iflag - 1], &s2r, &s2i);
        if (iflag == 1) {
            zuchk(s2r, s2i, &nw, bry[0], tol);
            if (nw != 0) goto L120;
        }
        if (zi <= 0.0) s2i = -s2i;
        str = s2r * c2r - s2i * c2i;
        s2i = s2r * c2i + s2i * c2r;
        s2r = str;
        cyr[i - 1] = s2r;
        cyi[i - 1] = s2i;
        const int j = nd - i + 1;
        yr[j - 1] = s2r * csrr[iflag - 1];
        yi[j - 1] = s2i * csrr[iflag - 1];
        str = -c2i * cidi;
        c2i = c2r * cidi;
        c2r = str;
    }
    // Recur backward for the rest.
    if (nd > 2) RecurIBackward(zr, zi, fnu, nd, cyr, cyi, iflag, bry, cssr, csrr, yr, yi);
    return;
L120:
    if (rs1 > 0.0) {
        *nz = -1;
        return;
    }
    // Set underflow and update parameters.
    if (!DropUnderflowed(zr, zi, fnu, kode, tol, elim, alim, yr, yi, &nd, nz)) return;
    fn = fnu + static_cast<double>(nd - 1);
    if (fn < fnul) {
        *nlast = nd;
        return;
    }
    in = inu + nd - 1;
    in = in % 4 + 1;
    c2r = car * d::CIPR[in - 1] - sar * d::CIPI[in - 1];
    c2i = car * d::CIPI[in - 1] + sar * d::CIPR[in - 1];
    if (zi <= 0.0) c2i = -c2i;
    goto L40;
}

void zbuni(double zr, double zi, double fnu, int kode, int n, double* yr, double* yi, int* nz, int nui,
           int* nlast, double fnul, double tol, double elim, double alim) {
    double cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0}, bry[3];
    int nw = 0;
    *nz = 0;
    const double ax = std::fabs(zr) * 1.7321;
    const double ay = std::fabs(zi);
    const int iform = ay > ax ? 2 : 1;
    if (nui == 0) {
        if (iform != 2)
            zuni1(zr, zi, fnu, kode, n, yr, yi, &nw, nlast, fnul, tol, elim, alim);
        else
            zuni2(zr, zi, fnu, kode, n, yr, yi, &nw, nlast, fnul, tol, elim, alim);
        if (nw < 0) {
            *nz = nw == -2 ? -2 : -1;
            return;
        }
        *nz = nw;
        return;
    }
    // Compute at order fnu + n - 1 + nui (where the expansion holds) and recur backward.
    double fnui = static_cast<double>(nui);
    const double dfnu = fnu + static_cast<double>(n - 1);
    const double gnu = dfnu + fnui;
    if (iform != 2)
        zuni1(zr, zi, gnu, kode, 2, cyr, cyi, &nw, nlast, fnul, tol, elim, alim);
    else
        zuni2(zr, zi, gnu, kode, 2, cyr, cyi, &nw, nlast, fnul, tol, elim, alim);
    if (nw < 0) {
        *nz = nw == -2 ? -2 : -1;
        return;
    }
    if (nw != 0) {
        *nlast = n;
        return;
    }
    double str = zabs(cyr[0], cyi[0]);
    // Scale the backward recurrence, bry[0] the underflow limit.
    bry[0] = 1.0e+3 * kD1Mach1 / tol;
    bry[1] = 1.0 / bry[0];
    bry[2] = bry[1];
    int iflag = 2;
    double ascle = bry[1];
    double csclr = 1.0;
    if (str <= bry[0]) {
        iflag = 1;
        ascle = bry[0];
        csclr = 1.0 / tol;
    } else if (str >= bry[1]) {
        iflag = 3;
        ascle = bry[2];
        csclr = tol;
    }
    double cscrr = 1.0 / csclr;
    double s1r = cyr[1] * csclr;
    double s1i = cyi[1] * csclr;
    double s2r = cyr[0] * csclr;
    double s2i = cyi[0] * csclr;
    const double raz = 1.0 / zabs(zr, zi);
    str = zr * raz;
    double sti = -zi * raz;
    const double rzr = (str + str) * raz;
    const double rzi = (sti + sti) * raz;
    for (int i = 1; i <= nui; ++i) {
        str = s2r;
        sti = s2i;
        s2r = (dfnu + fnui) * (rzr * str - rzi * sti) + s1r;
        s2i = (dfnu + fnui) * (rzr * sti + rzi * str) + s1i;
        s1r = str;
        s1i = sti;
        fnui = fnui - 1.0;
        RescaleBy(tol, s2r * cscrr, s2i * cscrr, bry, &iflag, &ascle, &csclr, &cscrr, &s1r, &s1i, &s2r, &s2i);
    }
    yr[n - 1] = s2r * cscrr;
    yi[n - 1] = s2i * cscrr;
    if (n == 1) return;
    const int nl = n - 1;
    fnui = static_cast<double>(nl);
    int k = nl;
    for (int i = 1; i <= nl; ++i) {
        str = s2r;
        sti = s2i;
        s2r = (fnu + fnui) * (rzr * str - rzi * sti) + s1r;
        s2i = (fnu + fnui) * (rzr * sti + rzi * str) + s1i;
        s1r = str;
        s1i = sti;
        str = s2r * cscrr;
        sti = s2i * cscrr;
        yr[k - 1] = str;
        yi[k - 1] = sti;
        fnui = fnui - 1.0;
        k = k - 1;
        RescaleBy(tol, str, sti, bry, &iflag, &ascle, &csclr, &cscrr, &s1r, &s1i, &s2r, &s2i);
    }
}

}  // namespace tw::amos
