/* Special functions: scalar entries. The real functions report nothing: an argument outside a
 * function's domain gives NaN and a pole or overflow its stated infinity, through the result
 * pointer. */
#ifndef TWANLYS_SPECIAL_H
#define TWANLYS_SPECIAL_H

#include "twanlys/types.h"

/* NaN as x selects the complete gamma function of a; otherwise the lower regularised P(a, x). */
TW_API void TW_Gamma(double a, double x, double* out);
/* selector 1: the complete gamma function of a (x ignored); any other value P(a, x). */
TW_API void TW_Gamma_85(double a, double x, double* out, int32_t selector);
/* The upper regularised incomplete gamma function Q(a, x). */
TW_API void TW_GammaC(double a, double x, double* out);
TW_API void TW_LnGamma(double x, double* out);
TW_API void TW_Stirling(double x, double* out);
TW_API void TW_Fact(int32_t n, double* out);
TW_API void TW_LnFact(int32_t n, double* out);
TW_API void TW_Psi(double x, double* out);
/* NaN as x selects the complete beta function B(a, b); otherwise the regularised I_x(a, b). */
TW_API void TW_Beta(double a, double b, double x, double* out);
/* selector 1: B(a, b) (x ignored); any other value I_x(a, b). */
TW_API void TW_Beta_85(double a, double b, double x, double* out, int32_t selector);
TW_API void TW_Erf(double x, double* out);
TW_API void TW_ErfC(double x, double* out);

/* Bessel functions of real order v: J_v(x), Y_v(x) and the modified I_v(x). */
TW_API void TW_BesselJr(double v, double x, double* out);
TW_API void TW_BesselYr(double v, double x, double* out);
TW_API void TW_BesselIr(double v, double x, double* out);
/* Modified Bessel function of the second kind K_n(x), integer order (|n| is used). */
TW_API void TW_BesselKn(int32_t n, double x, double* out);
/* Spherical Bessel functions j_n(x), y_n(x). */
TW_API void TW_BesselJs(int32_t n, double x, double* out);
TW_API void TW_BesselYs(int32_t n, double x, double* out);
/* Airy functions Ai, Bi and, when aip is not null, Ai', Bi' (each stored only through a non-null
 * pointer). */
TW_API void TW_Airy(double x, double* ai, double* bi, double* aip, double* bip);
/* Kelvin functions of integer order: ber_n + i bei_n = J_n(x e^(3 pi i/4)) and
 * ker_n + i kei_n = e^(-n pi i/2) K_n(x e^(pi i/4)). */
TW_API void TW_KelvinI(double x, int32_t n, double* ber, double* bei);
TW_API void TW_KelvinK(double x, int32_t n, double* ker, double* kei);

/* Complex Bessel functions of real order v >= 0 and complex z: J, Y, I, K and the Hankel function
 * of the first (kind 0) or second (kind 1) kind. scaling 1 gives the scaled forms
 * exp(-|Im z|) J, exp(-|Im z|) Y, exp(-|Re z|) I, exp(z) K, exp(-i z) H1 and exp(i z) H2; 0 the
 * functions themselves. The status tells an input error, overflow, reduced or lost precision;
 * out holds the value computed, also when the status is not 0. */
TW_API AnalysisStatus TW_CxBesselJr(const double* v, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out);
TW_API AnalysisStatus TW_CxBesselYr(const double* v, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out);
TW_API AnalysisStatus TW_CxBesselIr(const double* v, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out);
TW_API AnalysisStatus TW_CxBesselKr(const double* v, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out);
TW_API AnalysisStatus TW_CxBesselHr(const double* v, const ComplexDouble* z, const int32_t* kind,
                                    const int32_t* scaling, ComplexDouble* out);
/* Spherical forms: the function of order + 1/2 times (pi/2)/z. Any non-zero status of the inner
 * function ends as InternalErr with out holding the inner value, not multiplied. */
TW_API AnalysisStatus TW_CxBesselJs(const double* order, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out);
TW_API AnalysisStatus TW_CxBesselYs(const double* order, const ComplexDouble* z, const int32_t* scaling,
                                    ComplexDouble* out);
TW_API AnalysisStatus TW_CxBesselHs(const double* order, const ComplexDouble* z, const int32_t* kind,
                                    const int32_t* scaling, ComplexDouble* out);
/* Complex Airy functions: function 1 Ai, 2 Ai', 3 Bi, 4 Bi'; scaling 1 gives exp(zeta) Ai,
 * exp(zeta) Ai' and exp(-|Re zeta|) Bi, Bi' with zeta = (2/3) z^(3/2). Another function is
 * InvalidSelectorErr, out untouched. */
TW_API AnalysisStatus TW_CxAiry(const ComplexDouble* z, const int32_t* function, const int32_t* scaling,
                                ComplexDouble* out);

/* Elliptic integrals in the parameter m (not the modulus k): F(phi | m) and E(phi | m); NaN as phi
 * selects the complete K(m), E(m). */
TW_API void TW_Elliptic1(double m, double phi, double* out);
TW_API void TW_Elliptic2(double m, double phi, double* out);
/* selector 1: the complete integral (phi ignored); any other value the incomplete one. */
TW_API void TW_Elliptic1_85(double m, double phi, double* out, int32_t selector);
TW_API void TW_Elliptic2_85(double m, double phi, double* out, int32_t selector);
/* Jacobi's elliptic functions sn, cn, dn of u and the amplitude phi (phi may be null). */
TW_API void TW_EllipticJ(double u, double m, double* sn, double* cn, double* dn, double* phi);

/* Riemann zeta function. */
TW_API void TW_Zeta(double x, double* out);
/* Dilogarithm in Spence's form: the integral of ln t / (1 - t) from 1 to x, for x >= 0. */
TW_API void TW_Diln(double x, double* out);
/* Dawson's integral exp(-x^2) times the integral of exp(t^2) from 0 to x. */
TW_API void TW_Dawson(double x, double* out);
/* Fresnel integrals S(x) and C(x) with the phase pi t^2 / 2. */
TW_API void TW_FresnelIntegrals(double x, double* s, double* c);
/* Exponential integral E_n(x), x >= 0, n >= 0. */
TW_API void TW_ExpI(double x, int32_t n, double* out);
/* Sine and cosine integrals Si(x), Ci(x) (Ci of |x| for x < 0). */
TW_API void TW_SinI(double x, double* out);
TW_API void TW_CosI(double x, double* out);
/* Hyperbolic sine and cosine integrals Shi(x), Chi(x) (Chi of |x| for x < 0). */
TW_API void TW_SinhI(double x, double* out);
TW_API void TW_CoshI(double x, double* out);

/* Gauss's hypergeometric function 2F1(a, b; c; x), |x| <= 1. The 2011 generation takes the Pfaff
 * transformation below x = 0.2 rather than -0.5. */
TW_API void TW_Gauss(double x, double a, double b, double c, double* out);
TW_API void TW_Gauss_2011(double x, double a, double b, double c, double* out);
/* Kummer's confluent hypergeometric function M(a, b, x) = 1F1(a; b; x). */
TW_API void TW_Kummer(double x, double a, double b, double* out);
/* Tricomi's confluent hypergeometric function U(a, b, x), x >= 0. */
TW_API void TW_Tricomi(double x, double a, double b, double* out);

/* Struve's function H_v(x); x < 0 only for integer v. */
TW_API void TW_Struve(double x, double v, double* out);

/* The parabolic cylinder function D_v(x) (Whittaker's). */
TW_API void TW_ParabolicCylinder(double x, double v, double* out);

#endif
