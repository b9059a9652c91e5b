// K for large order by the uniform asymptotic expansions, after Amos, TOMS 644: zunk1 (Debye
// expansion, |arg z| <= pi/3), zunk2 (Airy-type expansion, pi/3 < |arg z| <= pi/2) and zbunk
// (the choice between them). With mr != 0 they also continue K to the left half plane, where
// K(z e^{i pi mr}) = K(z) e^{-i pi mr fnu} - i pi mr I(z) gives the result for Re z < 0.
#include "special/amos/amos.hpp"
#include "special/amos/common.hpp"

namespace tw::amos {

void zunk1(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz,
           double tol, double elim, double alim) {
    namespace d = data::zunk1;
    KPlusI add{};
    double bry[3], sumr[2] = {0.0, 0.0}, sumi[2] = {0.0, 0.0}, zeta1r[2] = {0.0, 0.0}, zeta1i[2] = {0.0, 0.0},
                   zeta2r[2] = {0.0, 0.0}, zeta2i[2] = {0.0, 0.0}, cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0},
                   phir[2] = {0.0, 0.0}, phii[2] = {0.0, 0.0}, cssr[3], csrr[3];
    // CWRK(16,3): column j holds the Debye terms of the j-th saved order.
    double cwrkr[48], cwrki[48];
    int init[2] = {0, 0};
    int i = 0, ib = 0, iflag = 0, ifn = 0, il = 0, inu = 0, iuf = 0, k = 0, kdflg = 0, kflag = 0, kk = 0,
        nw = 0, initd = 0, ic = 0, ipard = 0, j = 0, m = 0;
    double cki = 0.0, ckr = 0.0, csgni = 0.0, cspni = 0.0, cspnr = 0.0, c2i = 0.0, c2r = 0.0, fmr = 0.0,
           fn = 0.0, fnf = 0.0, phidi = 0.0, phidr = 0.0, razr = 0.0, rs1 = 0.0, rzi = 0.0, rzr = 0.0,
           sgn = 0.0, sti = 0.0, str = 0.0, sumdi = 0.0, sumdr = 0.0, s1i = 0.0, s1r = 0.0, s2i = 0.0,
           s2r = 0.0, zet1di = 0.0, zet1dr = 0.0, zet2di = 0.0, zet2dr = 0.0, zri = 0.0, zrr = 0.0;
    kdflg = 1;
    *nz = 0;
    // exp(-alim) = exp(-elim)/tol = approximately one digit of precision above the underflow limit.
    ScaleTriplets(tol, cssr, csrr, bry);
    zrr = zr;
    zri = zi;
    if (zr < 0.0) {
        zrr = -zr;
        zri = -zi;
    }
    j = 2;
    for (i = 1; i <= n; ++i) {
        // j flip-flops between 1 and 2 so the last two orders stay available.
        j = 3 - j;
        fn = fnu + static_cast<double>(i - 1);
        init[j - 1] = 0;
        zunik(zrr, zri, fn, 2, 0, tol, &init[j - 1], &phir[j - 1], &phii[j - 1], &zeta1r[j - 1],
              &zeta1i[j - 1], &zeta2r[j - 1], &zeta2i[j - 1], &sumr[j - 1], &sumi[j - 1],
              &cwrkr[16 * (j - 1)], &cwrki[16 * (j - 1)]);
        ExponentZeta2(kode, zrr, zri, zeta2r[j - 1], zeta2i[j - 1], fn, &str, &sti);
        s1r = zeta1r[j - 1] - str;
        s1i = zeta1i[j - 1] - sti;
        // Test for underflow and overflow.
        if (!ExponentInRange(s1r, elim, alim, kdflg == 1, &kflag, &rs1,
                             [&](double r) { return r + std::log(zabs(phir[j - 1], phii[j - 1])); }))
            goto L60;
        // Scale s1 to keep intermediate arithmetic on scale near exponent extremes.
        s2r = phir[j - 1] * sumr[j - 1] - phii[j - 1] * sumi[j - 1];
        s2i = phir[j - 1] * sumi[j - 1] + phii[j - 1] * sumr[j - 1];
        TimesScaledExp(s1r, s1i, cssr[kflag - 1], &s2r, &s2i);
        if (kflag == 1) {
            zuchk(s2r, s2i, &nw, bry[0], tol);
            if (nw != 0) goto L60;
        }
        cyr[kdflg - 1] = s2r;
        cyi[kdflg - 1] = s2i;
        yr[i - 1] = s2r * csrr[kflag - 1];
        yi[i - 1] = s2i * csrr[kflag - 1];
        if (kdflg == 2) goto L75;
        kdflg = 2;
        continue;
    L60:
        if (rs1 > 0.0) goto L300;
        // For zr < 0.0, the I function to be added will overflow.
        if (zr < 0.0) goto L300;
        kdflg = 1;
        ZeroWithPrevious(i, yr, yi, nz);
    }
    i = n;
L75:
    razr = 1.0 / zabs(zrr, zri);
    str = zrr * razr;
    sti = -zri * razr;
    rzr = (str + str) * razr;
    rzi = (sti + sti) * razr;
    ckr = fn * rzr;
    cki = fn * rzi;
    ib = i + 1;
    if (n >= ib) {
        // Test the last member for underflow and overflow; set the sequence to zero on underflow.
        fn = fnu + static_cast<double>(n - 1);
        ipard = 1;
        if (mr != 0) ipard = 0;
        initd = 0;
        zunik(zrr, zri, fn, 2, ipard, tol, &initd, &phidr, &phidi, &zet1dr, &zet1di, &zet2dr, &zet2di, &sumdr,
              &sumdi, &cwrkr[32], &cwrki[32]);
        ExponentZeta2(kode, zrr, zri, zet2dr, zet2di, fn, &str, &sti);
        s1r = zet1dr - str;
        s1i = zet1di - sti;
        if (LastMemberOutOfRange(s1r, phidr, phidi, elim, alim, &rs1)) {
            if (std::fabs(rs1) > 0.0) goto L300;
            // For zr < 0.0, the I function to be added will overflow.
            if (zr < 0.0) goto L300;
            *nz = n;
            ZeroSequence(n, yr, yi);
            return;
        }
        // Forward recurrence for the remaining members.
        RecurKForward<LargerNumber>(ib, n, cyr[0], cyi[0], cyr[1], cyi[1], ckr, cki, rzr, rzi, kflag, bry,
                                    cssr, csrr, yr, yi);
    }
    if (mr == 0) return;
    // Analytic continuation for Re z < 0.
    *nz = 0;
    fmr = static_cast<double>(mr);
    sgn = -std::copysign(d::PI, fmr);
    // cspn and csgn are coefficients of K and I respectively.
    csgni = sgn;
    inu = static_cast<int>(fnu);
    fnf = fnu - static_cast<double>(inu);
    ifn = inu + n - 1;
    ContinuationPhase(sgn, fnf, ifn, &cspnr, &cspni);
    add = KPlusI{zrr, zri, kode, bry[0], alim, cspnr, cspni, &iuf, nz};
    kk = n;
    kdflg = 1;
    ib = ib - 1;
    ic = ib - 1;
    for (k = 1; k <= n; ++k) {
        fn = fnu + static_cast<double>(kk - 1);
        // Logic to sort out cases whose parameters were set for the K function above.
        m = 3;
        if (n > 2) {
            if (kk == n && ib < n) goto L180;
            if (kk == ib || kk == ic) goto L172;
            initd = 0;
            goto L180;
        }
    L172:
        initd = init[j - 1];
        phidr = phir[j - 1];
        phidi = phii[j - 1];
        zet1dr = zeta1r[j - 1];
        zet1di = zeta1i[j - 1];
        zet2dr = zeta2r[j - 1];
        zet2di = zeta2i[j - 1];
        sumdr = sumr[j - 1];
        sumdi = sumi[j - 1];
        m = j;
        j = 3 - j;
    L180:
        zunik(zrr, zri, fn, 1, 0, tol, &initd, &phidr, &phidi, &zet1dr, &zet1di, &zet2dr, &zet2di, &sumdr,
              &sumdi, &cwrkr[16 * (m - 1)], &cwrki[16 * (m - 1)]);
        ExponentZeta2(kode, zrr, zri, zet2dr, zet2di, fn, &str, &sti);
        s1r = str - zet1dr;
        s1i = sti - zet1di;
        // Test for underflow and overflow.
        if (!ExponentInRange(s1r, elim, alim, kdflg == 1, &iflag, &rs1,
                             [&](double r) { return r + std::log(zabs(phidr, phidi)); }))
            goto L260;
        str = phidr * sumdr - phidi * sumdi;
        sti = phidr * sumdi + phidi * sumdr;
        s2r = -csgni * sti;
        s2i = csgni * str;
        TimesScaledExp(s1r, s1i, cssr[iflag - 1], &s2r, &s2i);
        if (iflag == 1) {
            zuchk(s2r, s2i, &nw, bry[0], tol);
            if (nw != 0) {
                s2r = d::ZEROR;
                s2i = d::ZEROI;
            }
        }
    L230:
        cyr[kdflg - 1] = s2r;
        cyi[kdflg - 1] = s2i;
        c2r = s2r;
        c2i = s2i;
        // Add I and K functions, K sequence in y(i), i = 1, n.
        add.Add(s2r * csrr[iflag - 1], s2i * csrr[iflag - 1], &yr[kk - 1], &yi[kk - 1]);
        kk = kk - 1;
        if (c2r != 0.0 || c2i != 0.0) {
            if (kdflg == 2) goto L275;
            kdflg = 2;
        } else {
            kdflg = 1;
        }
        continue;
    L260:
        if (rs1 > 0.0) goto L300;
        s2r = d::ZEROR;
        s2i = d::ZEROI;
        goto L230;
    }
    k = n;
L275:
    il = n - k;
    if (il == 0) return;
    // Recur backward for the remaining I terms and add them to the K terms.
    RecurIBackwardAddToK(il, cyr, cyi, iflag, static_cast<double>(inu + il), fnf, rzr, rzi, bry, cssr, csrr,
                         &add, kk, yr, yi);
    return;
L300:
    *nz = -1;
}

void zunk2(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz,
           double tol, double elim, double alim) {
    namespace d = data::zunk2;
    KPlusI add{};
    double bry[3], asumr[2] = {0.0, 0.0}, asumi[2] = {0.0, 0.0}, bsumr[2] = {0.0, 0.0}, bsumi[2] = {0.0, 0.0},
                   phir[2] = {0.0, 0.0}, phii[2] = {0.0, 0.0}, argr[2] = {0.0, 0.0}, argi[2] = {0.0, 0.0},
                   zeta1r[2] = {0.0, 0.0}, zeta1i[2] = {0.0, 0.0}, zeta2r[2] = {0.0, 0.0},
                   zeta2i[2] = {0.0, 0.0}, cyr[2] = {0.0, 0.0}, cyi[2] = {0.0, 0.0}, cssr[3], csrr[3];
    int i = 0, ib = 0, iflag = 0, ifn = 0, il = 0, in = 0, inu = 0, iuf = 0, k = 0, kdflg = 0, kflag = 0,
        kk = 0, nai = 0, ndai = 0, nw = 0, idum = 0, j = 0, ipard = 0, ic = 0;
    double aii = 0.0, air = 0.0, ang = 0.0, argdi = 0.0, argdr = 0.0, asumdi = 0.0, asumdr = 0.0,
           bsumdi = 0.0, bsumdr = 0.0, car = 0.0, cki = 0.0, ckr = 0.0, csgni = 0.0, csi = 0.0, cspni = 0.0,
           cspnr = 0.0, csr = 0.0, c2i = 0.0, c2r = 0.0, daii = 0.0, dair = 0.0, fmr = 0.0, fn = 0.0,
           fnf = 0.0, phidi = 0.0, phidr = 0.0, pti = 0.0, ptr = 0.0, razr = 0.0, rs1 = 0.0, rzi = 0.0,
           rzr = 0.0, sar = 0.0, sgn = 0.0, sti = 0.0, str = 0.0, s1i = 0.0, s1r = 0.0, s2i = 0.0, s2r = 0.0,
           yy = 0.0, zbi = 0.0, zbr = 0.0, zet1di = 0.0, zet1dr = 0.0, zet2di = 0.0, zet2dr = 0.0, zni = 0.0,
           znr = 0.0, zri = 0.0, zrr = 0.0;
    kdflg = 1;
    *nz = 0;
    // exp(-alim) = exp(-elim)/tol = approximately one digit of precision above the underflow limit.
    ScaleTriplets(tol, cssr, csrr, bry);
    zrr = zr;
    zri = zi;
    if (zr < 0.0) {
        zrr = -zr;
        zri = -zi;
    }
    yy = zri;
    znr = zri;
    zni = -zrr;
    zbr = zrr;
    zbi = zri;
    inu = static_cast<int>(fnu);
    fnf = fnu - static_cast<double>(inu);
    ang = -d::HPI * fnf;
    car = std::cos(ang);
    sar = std::sin(ang);
    c2r = d::HPI * sar;
    c2i = -d::HPI * car;
    kk = inu % 4 + 1;
    str = c2r * d::CIPR[kk - 1] - c2i * d::CIPI[kk - 1];
    sti = c2r * d::CIPI[kk - 1] + c2i * d::CIPR[kk - 1];
    csr = d::CR1R * str - d::CR1I * sti;
    csi = d::CR1R * sti + d::CR1I * str;
    if (yy <= 0.0) {
        znr = -znr;
        zbi = -zbi;
    }
    // K(fnu, z) is computed from H2(fnu, -i z) or H1(fnu, i z) by the Airy-type expansion.
    j = 2;
    for (i = 1; i <= n; ++i) {
        // j flip-flops between 1 and 2 so the last two orders stay available.
        j = 3 - j;
        fn = fnu + static_cast<double>(i - 1);
        zunhj(znr, zni, fn, 0, tol, &phir[j - 1], &phii[j - 1], &argr[j - 1], &argi[j - 1], &zeta1r[j - 1],
              &zeta1i[j - 1], &zeta2r[j - 1], &zeta2i[j - 1], &asumr[j - 1], &asumi[j - 1], &bsumr[j - 1],
              &bsumi[j - 1]);
        ExponentZeta2(kode, zbr, zbi, zeta2r[j - 1], zeta2i[j - 1], fn, &str, &sti);
        s1r = zeta1r[j - 1] - str;
        s1i = zeta1i[j - 1] - sti;
        // Test for underflow and overflow.
        if (!ExponentInRange(s1r, elim, alim, kdflg == 1, &kflag, &rs1, [&](double r) {
                return r + std::log(zabs(phir[j - 1], phii[j - 1])) -
                       0.25 * std::log(zabs(argr[j - 1], argi[j - 1])) - d::AIC;
            }))
            goto L70;
        // Scale s1 to keep intermediate arithmetic on scale near exponent extremes.
        c2r = argr[j - 1] * d::CR2R - argi[j - 1] * d::CR2I;
        c2i = argr[j - 1] * d::CR2I + argi[j - 1] * d::CR2R;
        zairy(c2r, c2i, 0, 2, &air, &aii, &nai, &idum);
        zairy(c2r, c2i, 1, 2, &dair, &daii, &ndai, &idum);
        str = dair * bsumr[j - 1] - daii * bsumi[j - 1];
        sti = dair * bsumi[j - 1] + daii * bsumr[j - 1];
        ptr = str * d::CR2R - sti * d::CR2I;
        pti = str * d::CR2I + sti * d::CR2R;
        str = ptr + (air * asumr[j - 1] - aii * asumi[j - 1]);
        sti = pti + (air * asumi[j - 1] + aii * asumr[j - 1]);
        ptr = str * phir[j - 1] - sti * phii[j - 1];
        pti = str * phii[j - 1] + sti * phir[j - 1];
        s2r = ptr * csr - pti * csi;
        s2i = ptr * csi + pti * csr;
        TimesScaledExp(s1r, s1i, cssr[kflag - 1], &s2r, &s2i);
        if (kflag == 1) {
            zuchk(s2r, s2i, &nw, bry[0], tol);
            if (nw != 0) goto L70;
        }
        if (yy <= 0.0) s2i = -s2i;
        cyr[kdflg - 1] = s2r;
        cyi[kdflg - 1] = s2i;
        yr[i - 1] = s2r * csrr[kflag - 1];
        yi[i - 1] = s2i * csrr[kflag - 1];
        str = csi;
        csi = -csr;
        csr = str;
        if (kdflg == 2) goto L85;
        kdflg = 2;
        continue;
    L70:
        if (rs1 > 0.0) goto L320;
        // For zr < 0.0, the I function to be added will overflow.
        if (zr < 0.0) goto L320;
        str = csi;
        csi = -csr;
        csr = str;
        kdflg = 1;
        ZeroWithPrevious(i, yr, yi, nz);
    }
    i = n;
L85:
    razr = 1.0 / zabs(zrr, zri);
    str = zrr * razr;
    sti = -zri * razr;
    rzr = (str + str) * razr;
    rzi = (sti + sti) * razr;
    ckr = fn * rzr;
    cki = fn * rzi;
    ib = i + 1;
    if (n >= ib) {
        // Test the last member for underflow and overflow; set the sequence to zero on underflow.
        fn = fnu + static_cast<double>(n - 1);
        ipard = 1;
        if (mr != 0) ipard = 0;
        zunhj(znr, zni, fn, ipard, tol, &phidr, &phidi, &argdr, &argdi, &zet1dr, &zet1di, &zet2dr, &zet2di,
              &asumdr, &asumdi, &bsumdr, &bsumdi);
        ExponentZeta2(kode, zbr, zbi, zet2dr, zet2di, fn, &str, &sti);
        s1r = zet1dr - str;
        s1i = zet1di - sti;
        if (LastMemberOutOfRange(s1r, phidr, phidi, elim, alim, &rs1)) {
            if (rs1 > 0.0) goto L320;
            // For zr < 0.0, the I function to be added will overflow.
            if (zr < 0.0) goto L320;
            *nz = n;
            ZeroSequence(n, yr, yi);
            return;
        }
        // Forward recurrence for the remaining members.
        RecurKForward<LargerNumber>(ib, n, cyr[0], cyi[0], cyr[1], cyi[1], ckr, cki, rzr, rzi, kflag, bry,
                                    cssr, csrr, yr, yi);
    }
    if (mr == 0) return;
    // Analytic continuation for Re z < 0.
    *nz = 0;
    fmr = static_cast<double>(mr);
    sgn = -std::copysign(d::PI, fmr);
    // cspn and csgn are coefficients of K and I respectively.
    csgni = sgn;
    if (yy <= 0.0) csgni = -csgni;
    ifn = inu + n - 1;
    ContinuationPhase(sgn, fnf, ifn, &cspnr, &cspni);
    // cs = coefficient of the Airy-type form of I, rotated through the powers of i.
    csr = sar * csgni;
    csi = car * csgni;
    in = ifn % 4 + 1;
    c2r = d::CIPR[in - 1];
    c2i = d::CIPI[in - 1];
    str = csr * c2r + csi * c2i;
    csi = -csr * c2i + csi * c2r;
    csr = str;
    add = KPlusI{zrr, zri, kode, bry[0], alim, cspnr, cspni, &iuf, nz};
    kk = n;
    kdflg = 1;
    ib = ib - 1;
    ic = ib - 1;
    for (k = 1; k <= n; ++k) {
        fn = fnu + static_cast<double>(kk - 1);
        // Logic to sort out cases whose parameters were set for the K function above.
        if (n > 2) {
            if (kk == n && ib < n) goto L210;
            if (kk == ib || kk == ic) goto L172;
            zunhj(znr, zni, fn, 0, tol, &phidr, &phidi, &argdr, &argdi, &zet1dr, &zet1di, &zet2dr, &zet2di,
                  &asumdr, &asumdi, &bsumdr, &bsumdi);
            goto L210;
        }
    L172:
        phidr = phir[j - 1];
        phidi = phii[j - 1];
        argdr = argr[j - 1];
        argdi = argi[j - 1];
        zet1dr = zeta1r[j - 1];
        zet1di = zeta1i[j - 1];
        zet2dr = zeta2r[j - 1];
        zet2di = zeta2i[j - 1];
        asumdr = asumr[j - 1];
        asumdi = asumi[j - 1];
        bsumdr = bsumr[j - 1];
        bsumdi = bsumi[j - 1];
        j = 3 - j;
    L210:
        ExponentZeta2(kode, zbr, zbi, zet2dr, zet2di, fn, &str, &sti);
        s1r = str - zet1dr;
        s1i = sti - zet1di;
        // Test for underflow and overflow.
        if (!ExponentInRange(s1r, elim, alim, kdflg == 1, &iflag, &rs1, [&](double r) {
                return r + std::log(zabs(phidr, phidi)) - 0.25 * std::log(zabs(argdr, argdi)) - d::AIC;
            }))
            goto L280;
        AiryTypeTerm(argdr, argdi, asumdr, asumdi, bsumdr, bsumdi, phidr, phidi, &ptr, &pti);
        s2r = ptr * csr - pti * csi;
        s2i = ptr * csi + pti * csr;
        TimesScaledExp(s1r, s1i, cssr[iflag - 1], &s2r, &s2i);
        if (iflag == 1) {
            zuchk(s2r, s2i, &nw, bry[0], tol);
            if (nw != 0) {
                s2r = d::ZEROR;
                s2i = d::ZEROI;
            }
        }
    L250:
        if (yy <= 0.0) s2i = -s2i;
        cyr[kdflg - 1] = s2r;
        cyi[kdflg - 1] = s2i;
        c2r = s2r;
        c2i = s2i;
        // Add I and K functions, K sequence in y(i), i = 1, n.
        add.Add(s2r * csrr[iflag - 1], s2i * csrr[iflag - 1], &yr[kk - 1], &yi[kk - 1]);
        kk = kk - 1;
        str = csi;
        csi = -csr;
        csr = str;
        if (c2r != 0.0 || c2i != 0.0) {
            if (kdflg == 2) goto L295;
            kdflg = 2;
        } else {
            kdflg = 1;
        }
        continue;
    L280:
        if (rs1 > 0.0) goto L320;
        s2r = d::ZEROR;
        s2i = d::ZEROI;
        goto L250;
    }
    k = n;
L295:
    il = n - k;
    if (il == 0) return;
    // Recur backward for the remaining I terms and add them to the K terms.
    RecurIBackwardAddToK(il, cyr, cyi, iflag, static_cast<double>(inu + il), fnf, rzr, rzi, bry, cssr, csrr,
                         &add, kk, yr, yi);
    return;
L320:
    *nz = -1;
}

void zbunk(double zr, double zi, double fnu, int kode, int mr, int n, double* yr, double* yi, int* nz,
           double tol, double elim, double alim) {
    *nz = 0;
    const double ax = std::fabs(zr) * 1.7321;
    const double ay = std::fabs(zi);
    if (ay > ax) {
        // Asymptotic expansion for K(fnu, z) for large fnu applied in pi/3 < |arg z| <= pi/2.
        zunk2(zr, zi, fnu, kode, mr, n, yr, yi, nz, tol, elim, alim);
    } else {
        // Asymptotic expansion for K(fnu, z) for large fnu applied in -pi/3 <= arg z <= pi/3.
        zunk1(zr, zi, fnu, kode, mr, n, yr, yi, nz, tol, elim, alim);
    }
}

}  // namespace tw::amos
