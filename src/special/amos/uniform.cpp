// The uniform asymptotic expansions for large order, after Amos, TOMS 644: zunik (the Debye
// expansion for I and K, region |arg z| <= pi/3) and zunhj (the Airy-type expansion for the
// Hankel functions, region pi/3 <= |arg z| <= pi/2). Every quantity follows the published names.
#include "special/amos/amos.hpp"

namespace tw::amos {

void zunik(double zrr, double zri, double fnu, int ikflg, int ipmtr, double tol, int* init, double* phir,
           double* phii, double* zeta1r, double* zeta1i, double* zeta2r, double* zeta2i, double* sumr,
           double* sumi, double* cwrkr, double* cwrki) {
    namespace d = data::zunik;
    if (*init == 0) {
        // First call for this z and order: zeta1, zeta2, phi and the Debye terms go into cwrk,
        // kept for the second call (the other function or the other ikflg).
        const double rfn = 1.0 / fnu;
        double test = kD1Mach1 * 1.0e+3;
        double ac = fnu * test;
        if (!(std::fabs(zrr) > ac || std::fabs(zri) > ac)) {
            *zeta1r = 2.0 * std::fabs(std::log(test)) + fnu;
            *zeta1i = 0.0;
            *zeta2r = fnu;
            *zeta2i = 0.0;
            *phir = 1.0;
            *phii = 0.0;
            return;
        }
        double tr = zrr * rfn;
        double ti = zri * rfn;
        double sr = d::CONER + (tr * tr - ti * ti);
        double si = d::CONEI + (tr * ti + ti * tr);
        double srr = 0.0, sri = 0.0;
        zsqrt(sr, si, &srr, &sri);
        double str = d::CONER + srr;
        double sti = d::CONEI + sri;
        double znr = 0.0, zni = 0.0;
        zdiv(str, sti, tr, ti, &znr, &zni);
        int idum = 0;
        zlog(znr, zni, &str, &sti, &idum);
        *zeta1r = fnu * str;
        *zeta1i = fnu * sti;
        *zeta2r = fnu * srr;
        *zeta2i = fnu * sri;
        zdiv(d::CONER, d::CONEI, srr, sri, &tr, &ti);
        srr = tr * rfn;
        sri = ti * rfn;
        zsqrt(srr, sri, &cwrkr[15], &cwrki[15]);
        *phir = cwrkr[15] * d::CON[ikflg - 1];
        *phii = cwrki[15] * d::CON[ikflg - 1];
        if (ipmtr != 0) return;
        double t2r = 0.0, t2i = 0.0;
        zdiv(d::CONER, d::CONEI, sr, si, &t2r, &t2i);
        cwrkr[0] = d::CONER;
        cwrki[0] = d::CONEI;
        double crfnr = d::CONER;
        double crfni = d::CONEI;
        ac = 1.0;
        int l = 1;
        int k = 2;
        for (; k <= 15; ++k) {
            sr = d::ZEROR;
            si = d::ZEROI;
            for (int j = 1; j <= k; ++j) {
                l = l + 1;
                str = sr * t2r - si * t2i + d::C[l - 1];
                si = sr * t2i + si * t2r;
                sr = str;
            }
            str = crfnr * srr - crfni * sri;
            crfni = crfnr * sri + crfni * srr;
            crfnr = str;
            cwrkr[k - 1] = crfnr * sr - crfni * si;
            cwrki[k - 1] = crfnr * si + crfni * sr;
            ac = ac * rfn;
            test = std::fabs(cwrkr[k - 1]) + std::fabs(cwrki[k - 1]);
            if (ac < tol && test < tol) break;
        }
        if (k > 15) k = 15;
        *init = k;
    }
    if (ikflg != 2) {
        // Sum for the I function.
        double sr = d::ZEROR;
        double si = d::ZEROI;
        for (int i = 1; i <= *init; ++i) {
            sr = sr + cwrkr[i - 1];
            si = si + cwrki[i - 1];
        }
        *sumr = sr;
        *sumi = si;
        *phir = cwrkr[15] * d::CON[0];
        *phii = cwrki[15] * d::CON[0];
        return;
    }
    // Sum for the K function: the terms alternate.
    double sr = d::ZEROR;
    double si = d::ZEROI;
    double tr = d::CONER;
    for (int i = 1; i <= *init; ++i) {
        sr = sr + tr * cwrkr[i - 1];
        si = si + tr * cwrki[i - 1];
        tr = -tr;
    }
    *sumr = sr;
    *sumi = si;
    *phir = cwrkr[15] * d::CON[1];
    *phii = cwrki[15] * d::CON[1];
}

void zunhj(double zr, double zi, double fnu, int ipmtr, double tol, double* phir, double* phii, double* argr,
           double* argi, double* zeta1r, double* zeta1i, double* zeta2r, double* zeta2i, double* asumr,
           double* asumi, double* bsumr, double* bsumi) {
    namespace d = data::zunhj;
    const double rfnu = 1.0 / fnu;
    // Overflow test: z/fnu too small for the expansion.
    const double test = kD1Mach1 * 1.0e+3;
    const double ac = fnu * test;
    if (!(std::fabs(zr) > ac || std::fabs(zi) > ac)) {
        *zeta1r = 2.0 * std::fabs(std::log(test)) + fnu;
        *zeta1i = 0.0;
        *zeta2r = fnu;
        *zeta2i = 0.0;
        *phir = 1.0;
        *phii = 0.0;
        *argr = 1.0;
        *argi = 0.0;
        return;
    }
    const double zbr = zr * rfnu;
    const double zbi = zi * rfnu;
    const double rfnu2 = rfnu * rfnu;
    // Parameters for the large-order expansion.
    const double fn13 = std::pow(fnu, d::EX1);
    const double fn23 = fn13 * fn13;
    const double rfn13 = 1.0 / fn13;
    const double w2r = d::CONER - zbr * zbr + zbi * zbi;
    const double w2i = d::CONEI - zbr * zbi - zbr * zbi;
    const double aw2 = zabs(w2r, w2i);
    double str = 0.0, sti = 0.0, zar = 0.0, zai = 0.0, pp = 0.0;
    if (aw2 <= 0.25) {
        // Power series in w2 = 1 - (z/fnu)^2 for zeta, A and B near the turning point.
        double pr[30], pi[30], ap[30];
        int k = 1;
        pr[0] = d::CONER;
        pi[0] = d::CONEI;
        double sumar = d::GAMA[0];
        double sumai = d::ZEROI;
        ap[0] = 1.0;
        if (aw2 >= tol) {
            for (k = 2; k <= 30; ++k) {
                pr[k - 1] = pr[k - 2] * w2r - pi[k - 2] * w2i;
                pi[k - 1] = pr[k - 2] * w2i + pi[k - 2] * w2r;
                sumar = sumar + pr[k - 1] * d::GAMA[k - 1];
                sumai = sumai + pi[k - 1] * d::GAMA[k - 1];
                ap[k - 1] = ap[k - 2] * aw2;
                if (ap[k - 1] < tol) break;
            }
            if (k > 30) k = 30;
        }
        const int kmax = k;
        const double zetar = w2r * sumar - w2i * sumai;
        const double zetai = w2r * sumai + w2i * sumar;
        *argr = zetar * fn23;
        *argi = zetai * fn23;
        zsqrt(sumar, sumai, &zar, &zai);
        zsqrt(w2r, w2i, &str, &sti);
        *zeta2r = str * fnu;
        *zeta2i = sti * fnu;
        str = d::CONER + d::EX2 * (zetar * zar - zetai * zai);
        sti = d::CONEI + d::EX2 * (zetar * zai + zetai * zar);
        *zeta1r = str * *zeta2r - sti * *zeta2i;
        *zeta1i = str * *zeta2i + sti * *zeta2r;
        zar = zar + zar;
        zai = zai + zai;
        zsqrt(zar, zai, &str, &sti);
        *phir = str * rfn13;
        *phii = sti * rfn13;
        if (ipmtr == 1) return;
        // Sums for A and B.
        double sumbr = d::ZEROR;
        double sumbi = d::ZEROI;
        for (k = 1; k <= kmax; ++k) {
            sumbr = sumbr + pr[k - 1] * d::BETA[k - 1];
            sumbi = sumbi + pi[k - 1] * d::BETA[k - 1];
        }
        *asumr = d::ZEROR;
        *asumi = d::ZEROI;
        *bsumr = sumbr;
        *bsumi = sumbi;
        int l1 = 0;
        int l2 = 30;
        const double btol = tol * (std::fabs(*bsumr) + std::fabs(*bsumi));
        double atol = tol;
        pp = 1.0;
        int ias = 0;
        int ibs = 0;
        if (rfnu2 >= tol) {
            for (int is = 2; is <= 7; ++is) {
                atol = atol / rfnu2;
                pp = pp * rfnu2;
                if (ias != 1) {
                    sumar = d::ZEROR;
                    sumai = d::ZEROI;
                    for (k = 1; k <= kmax; ++k) {
                        const int m = l1 + k;
                        sumar = sumar + pr[k - 1] * d::ALFA[m - 1];
                        sumai = sumai + pi[k - 1] * d::ALFA[m - 1];
                        if (ap[k - 1] < atol) break;
                    }
                    *asumr = *asumr + sumar * pp;
                    *asumi = *asumi + sumai * pp;
                    if (pp < tol) ias = 1;
                }
                if (ibs != 1) {
                    sumbr = d::ZEROR;
                    sumbi = d::ZEROI;
                    for (k = 1; k <= kmax; ++k) {
                        const int m = l2 + k;
                        sumbr = sumbr + pr[k - 1] * d::BETA[m - 1];
                        sumbi = sumbi + pi[k - 1] * d::BETA[m - 1];
                        if (ap[k - 1] < atol) break;
                    }
                    *bsumr = *bsumr + sumbr * pp;
                    *bsumi = *bsumi + sumbi * pp;
                    if (pp < btol) ibs = 1;
                }
                if (ias == 1 && ibs == 1) break;
                l1 = l1 + 30;
                l2 = l2 + 30;
            }
        }
        *asumr = *asumr + d::CONER;
        pp = rfnu * rfn13;
        *bsumr = *bsumr * pp;
        *bsumi = *bsumi * pp;
        return;
    }
    // |w2| > 0.25: zeta and the sums from the Debye polynomials.
    double wr = 0.0, wi = 0.0;
    zsqrt(w2r, w2i, &wr, &wi);
    if (wr < 0.0) wr = 0.0;
    if (wi < 0.0) wi = 0.0;
    str = d::CONER + wr;
    sti = wi;
    zdiv(str, sti, zbr, zbi, &zar, &zai);
    double zcr = 0.0, zci = 0.0;
    int idum = 0;
    zlog(zar, zai, &zcr, &zci, &idum);
    if (zci < 0.0) zci = 0.0;
    if (zci > d::HPI) zci = d::HPI;
    if (zcr < 0.0) zcr = 0.0;
    const double zthr = (zcr - wr) * 1.5;
    const double zthi = (zci - wi) * 1.5;
    *zeta1r = zcr * fnu;
    *zeta1i = zci * fnu;
    *zeta2r = wr * fnu;
    *zeta2i = wi * fnu;
    const double azth = zabs(zthr, zthi);
    double ang = d::THPI;
    if (!(zthr >= 0.0 && zthi < 0.0)) {
        ang = d::HPI;
        if (zthr != 0.0) {
            ang = std::atan(zthi / zthr);
            if (zthr < 0.0) ang = ang + d::GPI;
        }
    }
    pp = std::pow(azth, d::EX2);
    ang = ang * d::EX2;
    const double zetar = pp * std::cos(ang);
    double zetai = pp * std::sin(ang);
    if (zetai < 0.0) zetai = 0.0;
    *argr = zetar * fn23;
    *argi = zetai * fn23;
    double rtztr = 0.0, rtzti = 0.0;
    zdiv(zthr, zthi, zetar, zetai, &rtztr, &rtzti);
    zdiv(rtztr, rtzti, wr, wi, &zar, &zai);
    const double tzar = zar + zar;
    const double tzai = zai + zai;
    zsqrt(tzar, tzai, &str, &sti);
    *phir = str * rfn13;
    *phii = sti * rfn13;
    if (ipmtr == 1) return;
    const double raw = 1.0 / std::sqrt(aw2);
    str = wr * raw;
    sti = -wi * raw;
    const double tfnr = str * rfnu * raw;
    const double tfni = sti * rfnu * raw;
    const double razth = 1.0 / azth;
    str = zthr * razth;
    sti = -zthi * razth;
    const double rzthr = str * razth * rfnu;
    const double rzthi = sti * razth * rfnu;
    zcr = rzthr * d::AR[1];
    zci = rzthi * d::AR[1];
    const double raw2 = 1.0 / aw2;
    str = w2r * raw2;
    sti = -w2i * raw2;
    const double t2r = str * raw2;
    const double t2i = sti * raw2;
    str = t2r * d::C[1] + d::C[2];
    sti = t2i * d::C[1];
    double upr[14], upi[14], crr[14], cri[14], drr[14], dri[14];
    upr[1] = str * tfnr - sti * tfni;
    upi[1] = str * tfni + sti * tfnr;
    *bsumr = upr[1] + zcr;
    *bsumi = upi[1] + zci;
    *asumr = d::ZEROR;
    *asumi = d::ZEROI;
    if (rfnu >= tol) {
        double przthr = rzthr;
        double przthi = rzthi;
        double ptfnr = tfnr;
        double ptfni = tfni;
        upr[0] = d::CONER;
        upi[0] = d::CONEI;
        pp = 1.0;
        const double btol = tol * (std::fabs(*bsumr) + std::fabs(*bsumi));
        int ks = 0;
        int kp1 = 2;
        int l = 3;
        int ias = 0;
        int ibs = 0;
        for (int lr = 2; lr <= 12; lr += 2) {
            const int lrp1 = lr + 1;
            // Two more terms of the Debye polynomials, and the matching products for A and B.
            for (int k = lr; k <= lrp1; ++k) {
                ks = ks + 1;
                kp1 = kp1 + 1;
                l = l + 1;
                zar = d::C[l - 1];
                zai = d::ZEROI;
                for (int j = 2; j <= kp1; ++j) {
                    l = l + 1;
                    str = zar * t2r - t2i * zai + d::C[l - 1];
                    zai = zar * t2i + zai * t2r;
                    zar = str;
                }
                str = ptfnr * tfnr - ptfni * tfni;
                ptfni = ptfnr * tfni + ptfni * tfnr;
                ptfnr = str;
                upr[kp1 - 1] = ptfnr * zar - ptfni * zai;
                upi[kp1 - 1] = ptfni * zar + ptfnr * zai;
                crr[ks - 1] = przthr * d::BR[ks];
                cri[ks - 1] = przthi * d::BR[ks];
                str = przthr * rzthr - przthi * rzthi;
                przthi = przthr * rzthi + przthi * rzthr;
                przthr = str;
                drr[ks - 1] = przthr * d::AR[ks + 1];
                dri[ks - 1] = przthi * d::AR[ks + 1];
            }
            pp = pp * rfnu2;
            if (ias != 1) {
                double sumar = upr[lrp1 - 1];
                double sumai = upi[lrp1 - 1];
                int ju = lrp1;
                for (int jr = 1; jr <= lr; ++jr) {
                    ju = ju - 1;
                    sumar = sumar + crr[jr - 1] * upr[ju - 1] - cri[jr - 1] * upi[ju - 1];
                    sumai = sumai + crr[jr - 1] * upi[ju - 1] + cri[jr - 1] * upr[ju - 1];
                }
                *asumr = *asumr + sumar;
                *asumi = *asumi + sumai;
                const double tst = std::fabs(sumar) + std::fabs(sumai);
                if (pp < tol && tst < tol) ias = 1;
            }
            if (ibs != 1) {
                double sumbr = upr[lr + 1] + upr[lrp1 - 1] * zcr - upi[lrp1 - 1] * zci;
                double sumbi = upi[lr + 1] + upr[lrp1 - 1] * zci + upi[lrp1 - 1] * zcr;
                int ju = lrp1;
                for (int jr = 1; jr <= lr; ++jr) {
                    ju = ju - 1;
                    sumbr = sumbr + drr[jr - 1] * upr[ju - 1] - dri[jr - 1] * upi[ju - 1];
                    sumbi = sumbi + drr[jr - 1] * upi[ju - 1] + dri[jr - 1] * upr[ju - 1];
                }
                *bsumr = *bsumr + sumbr;
                *bsumi = *bsumi + sumbi;
                const double tst = std::fabs(sumbr) + std::fabs(sumbi);
                if (pp < btol && tst < btol) ibs = 1;
            }
            if (ias == 1 && ibs == 1) break;
        }
    }
    *asumr = *asumr + d::CONER;
    str = -*bsumr * rfn13;
    sti = -*bsumi * rfn13;
    zdiv(str, sti, rtztr, rtzti, bsumr, bsumi);
}

}  // namespace tw::amos
