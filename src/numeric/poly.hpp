// Polynomials with coefficients in ascending powers (element i belongs to x^i): evaluation,
// products, refinement of given roots, all roots of a complex polynomial, the numerical greatest
// common divisor and roots with their multiplicities. Real and complex twins are one template.
#pragma once

#include <cstdint>

#include "matrix/matrix_core.hpp"

namespace tw {

// x[i] = c[0] + c[1] x + ... in the power form (a running power, not Horner's rule), in place.
// nc >= 1.
void PolyEvaluate(const double* c, int32_t nc, double* x, int32_t nx);

// out (na + nb - 1 elements) = a * b by direct convolution; na, nb >= 1.
template <class T>
void PolyMultiply(const T* a, int32_t na, const T* b, int32_t nb, T* out);

// Newton's method on the n coefficients c (derivative d, n - 1 coefficients) from the start x;
// the iterate of least |c(x)| is returned.
double NewtonRefine(const double* c, const double* d, int32_t n, double x, int32_t limit, double tol);

// Bairstow's method on the quadratic factor with roots p and q; roots gets the two refined roots,
// real before complex, a pair negative imaginary part first. work holds 2 n doubles.
void BairstowRefine(const double* a, int32_t n, cdouble p, cdouble q, int32_t limit, double tol, double* work,
                    cdouble* roots);

// One root per start value, real starts (Newton) first, then the complex starts taken in pairs
// (Bairstow). An unpaired last complex start is copied. roots holds nr + nx entries.
Status PolyRootsRefine(const double* c, int32_t n, const double* real, int32_t nr, int32_t newtonLimit,
                       double newtonTol, const cdouble* cx, int32_t nx, int32_t bairstowLimit,
                       double bairstowTol, cdouble* roots);

// All roots of the n coefficients c, written over c; *count gets their number (zero roots first,
// exactly 0). limit is the iteration limit per root (below 1: 100); past it the iterate of least
// |p| is taken. -20063 when fewer than 2 coefficients remain after zero high ones, or for a
// non-finite coefficient; -20062 should a root not be representable.
Status CxPolyRoots(cdouble* c, int32_t n, int32_t limit, int32_t* count);

// Monic numerical greatest common divisor g of a and b, with a = g u and b = g v. g holds
// max(na, nb) elements, u na and v nb; the counts come back in ng, nu, nv. residual is
// max(||a - g u|| / ||a||, ||b - g v|| / ||b||). tol <= 0 means 1e-8. gcd(0, b) is b made monic;
// both zero: -20111. A divisor whose residual exceeds 100 tol gives way to 1.
template <class T>
Status PolyGcd(const T* a, int32_t na, const T* b, int32_t nb, double tol, T* g, int32_t* ng, T* u,
               int32_t* nu, T* v, int32_t* nv, double* residual);

// Distinct roots and their multiplicities of the n coefficients c. roots and mult hold n entries;
// *count gets the number of distinct roots. limit is the inner root finder's limit (below 1: 100),
// tol <= 0 means 1e-10. For real c a complex pair is listed side by side, positive imaginary part
// first, as exact conjugates. residual is ||c - lead prod (x - r)^m|| / ||c||. When the structure
// found does not reproduce c within 100 tol, the simple roots of least residual are returned.
template <class T>
Status MultPolyRoots(const T* c, int32_t n, int32_t limit, double tol, cdouble* roots, int32_t* mult,
                     int32_t* count, double* residual);

}  // namespace tw
