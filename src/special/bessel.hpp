// The real Bessel family: J, Y, I of real order, integer-order J, Y, I, K, the orders 0 and 1, Airy
// functions and the confluent hypergeometric 1F1 that the modified function of real order needs.
// Cephes routines (with their tables) for real order, orders 0 and 1 and Airy; classic recurrences
// with accuracy constant 100 for integer order. None reports a status.
#pragma once

#include <cstdint>

namespace tw {

double BesselJ0(double x);
double BesselJ1(double x);  // x >= 0
double BesselY0(double x);
double BesselY1(double x);
double BesselI0(double x);
double BesselI1(double x);
double BesselK0(double x);
double BesselK1(double x);

double BesselJn(int32_t n, double x);
double BesselYn(int32_t n, double x);
double BesselIn(int32_t n, double x);
double BesselKn(int32_t n, double x);

double BesselJ(double v, double x);
double BesselY(double v, double x);
double BesselI(double v, double x);

// Spherical j_n, y_n as J, Y of order n + 1/2 times sqrt(pi / 2x).
double SphericalBesselJ(int32_t n, double x);
double SphericalBesselY(int32_t n, double x);

// Ai, Bi always; Ai', Bi' only when aip is non-null. Each result only through a non-null pointer.
void AiryFunctions(double x, double* ai, double* bi, double* aip, double* bip);

// ber_n + i bei_n = J_n(x e^(3 pi i / 4)); ker_n + i kei_n = e^(-n pi i / 2) K_n(x e^(pi i / 4)).
void KelvinI(double x, int32_t n, double* ber, double* bei);
void KelvinK(double x, int32_t n, double* ker, double* kei);

// Kummer's function M(a, b, x).
double Hyp1F1(double a, double b, double x);

// Log |Gamma(x)| for any real x, with the sign of Gamma(x) in *sign (reflection below 0).
double LnGammaSigned(double x, int* sign);

}  // namespace tw
