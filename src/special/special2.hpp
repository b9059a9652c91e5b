// Elliptic integrals and Jacobi's functions, Gauss's and Tricomi's hypergeometric functions, zeta,
// the dilogarithm, Struve and parabolic cylinder functions, Dawson's and Fresnel's integrals and
// the exponential, sine, cosine and hyperbolic integrals. Cephes routines with their tables where
// one exists, with this library's screens. None reports a status.
#pragma once

namespace tw {

// Elliptic integrals in the parameter m (not the modulus).
double EllipticK(double m);
double EllipticE(double m);
double EllipticF(double phi, double m);
double EllipticEInc(double phi, double m);
// sn, cn, dn and the amplitude phi of u; phi only through a non-null pointer.
void JacobiElliptic(double u, double m, double* sn, double* cn, double* dn, double* phi);

// 2F1(a, b; c; x); pfaffBelow is the x under which the Pfaff transformation is taken.
double Hyp2F1(double a, double b, double c, double x, double pfaffBelow);
double HypU(double a, double b, double x);

double Zeta(double x);
double Spence(double x);
double Struve(double v, double x);
double ParabolicCylinderD(double v, double x);
double Dawson(double x);
void Fresnel(double x, double* s, double* c);
double ExpN(int n, double x);
void SinCosIntegral(double x, double* si, double* ci);
void ShiChi(double x, double* shi, double* chi);

}  // namespace tw
