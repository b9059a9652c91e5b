/* Numerical utilities: integration of sampled data, coordinates, scaling and vector norms, polynomials. */
#ifndef TWANLYS_NUMERIC_H
#define TWANLYS_NUMERIC_H

#include "twanlys/types.h"

/* Integration of uniformly sampled data. method: 0 trapezoid, 1 Simpson, 2 Simpson 3/8, 3 Bode;
 * the 1-D _2017 export adds 4 left and 5 right rectangle. Steps are taken by magnitude. The result
 * is NaN on failure. 2-D spacing: the step along a row, then between rows. A 3-D block holds
 * i32 d0, d1, d2, then d2 slabs of d0 rows by d1 columns; its spacing has three steps. */
TW_API int32_t NumerIntegration_head(Array1DHandle x, double* dt, int32_t* method, double* result,
                                     int32_t* status);
TW_API int32_t NumerIntegration_2017_head(Array1DHandle x, double* dt, int32_t* method, double* result);
TW_API int32_t NumerIntegration2D_head(Array2DHandle data, Array1DHandle spacing, uint16_t method,
                                       double* result);
TW_API int32_t NumerIntegration2D_2017_head(Array2DHandle data, Array1DHandle spacing, uint16_t method,
                                            double* result);
TW_API int32_t NumerIntegration3D_head(NumericHandle data, Array1DHandle spacing, uint16_t method,
                                       double* result);
TW_API int32_t NumerIntegration3D_2017_head(NumericHandle data, Array1DHandle spacing, uint16_t method,
                                            double* result);

/* Coordinates: inputs of equal length n in, outputs resized to n, status as result. Angles in
 * radians. Euler sequence 0..11: XYZ XZY YXZ YZX ZXY ZYX XYX XZX YXY YZY ZXZ ZYZ, the axes of the
 * first, second and third angle; exports without a sequence use 10 (ZXZ). Rotations turn the frame
 * (passive); the 3 x 3 direction matrix is M = R3 R2 R1 and a point maps as new = M old. */
TW_API int32_t CartesianShift2D_head(Array1DHandle x, Array1DHandle y, double dx, double dy, Array1DHandle newX,
                                     Array1DHandle newY);
TW_API int32_t CartesianShift3D_head(Array1DHandle x, Array1DHandle y, Array1DHandle z, double dx, double dy,
                                     double dz, Array1DHandle newX, Array1DHandle newY, Array1DHandle newZ);
TW_API int32_t CoordRotation2D_head(Array1DHandle x, Array1DHandle y, double angle, Array1DHandle newX,
                                    Array1DHandle newY);
TW_API int32_t CoordRotationEuler_head(Array1DHandle x, Array1DHandle y, Array1DHandle z, double alpha,
                                       double beta, double gamma, Array1DHandle newX, Array1DHandle newY,
                                       Array1DHandle newZ);
TW_API int32_t CoordRotationEuler2011_head(Array1DHandle x, Array1DHandle y, Array1DHandle z, double alpha,
                                           double beta, double gamma, int32_t sequence, Array1DHandle newX,
                                           Array1DHandle newY, Array1DHandle newZ);
/* kind 1: the matrix holds direction cosines; 0: the angles between the axes. */
TW_API int32_t CoordRotationDirect_head(Array1DHandle x, Array1DHandle y, Array1DHandle z, Array2DHandle matrix,
                                        uint16_t kind, Array1DHandle newX, Array1DHandle newY,
                                        Array1DHandle newZ);
TW_API int32_t Euler2Direction_head(double alpha, double beta, double gamma, Array2DHandle matrix);
TW_API int32_t Euler2Direction2011_head(double alpha, double beta, double gamma, int32_t sequence,
                                        Array2DHandle matrix);
TW_API int32_t Direction2Euler_head(Array2DHandle matrix, double* alpha, double* beta, double* gamma);
TW_API int32_t Direction2Euler2011_head(Array2DHandle matrix, int32_t sequence, double* alpha, double* beta,
                                        double* gamma);
/* conversion 0: (x, y, z) to (r, theta, phi), phi from the z axis; 1: back; 2: (x, y, z) to
 * (rho, theta, z); 3: back. unit 0 radians, 1 degrees. */
TW_API int32_t CoordConversion_head(Array1DHandle a, Array1DHandle b, Array1DHandle c, uint16_t conversion,
                                    uint16_t unit, Array1DHandle first, Array1DHandle second,
                                    Array1DHandle third);

/* In-place scaling of whole arrays; 2-D exports treat rows * columns elements as one run. On
 * failure the data are emptied and the scalar results are NaN. Status through the last pointer. */
TW_API int32_t Scale(Array2DHandle data, double* offset, double* scale, int32_t* status);
TW_API int32_t Scale1DCIN(Array1DHandle data, double* offset, double* scale, int32_t* status);
TW_API int32_t QScale(Array2DHandle data, double* peak, int32_t* status);
TW_API int32_t QS1D(Array1DHandle data, double* peak, int32_t* status);
/* x * multiplier + offset; note the two argument orders. */
TW_API int32_t Line1(Array1DHandle data, double* offset, double* multiplier, int32_t* status);
TW_API int32_t LinEv(Array2DHandle data, double* multiplier, double* offset, int32_t* status);
/* (x - mean) / deviation with the population deviation. */
TW_API int32_t Norm1(Array1DHandle data, double* deviation, double* mean, int32_t* status);
TW_API int32_t Norm2(Array2DHandle data, double* deviation, double* mean, int32_t* status);
TW_API int32_t RectToPolar1D_head(Array1DHandle x, Array1DHandle y, int32_t* status);
TW_API int32_t PolarToRect1D_head(Array1DHandle magnitude, Array1DHandle phase, int32_t* status);

/* Vector norm of order y (2 where no order is taken), the data scaled to unit norm unless the
 * norm is 0. */
TW_API int32_t unitVector_head(Array1DHandle data, double* norm, int32_t* status);
TW_API int32_t unitVector80_head(Array1DHandle data, double y, double* norm);
TW_API int32_t CxUnitVector_head(Array1DHandle data, double* norm);
TW_API int32_t CxUnitVector80_head(Array1DHandle data, double y, double* norm);

/* Polynomials, coefficients in ascending powers (element i belongs to x^i); roots are complex.
 * Evaluation is in the power form (a running power, not Horner's rule), in place. */
TW_API int32_t PolyEv(Array1DHandle x, Array1DHandle coefficients, int32_t* status);
TW_API int32_t EvPoly2D(Array2DHandle x, Array1DHandle coefficients, int32_t* status);
/* The product has na + nb - 1 elements; the real one is resized as that many complex elements. */
TW_API int32_t MultiplyPolyH(Array1DHandle a, Array1DHandle b, Array1DHandle product);
TW_API int32_t CxMultiplyPolyH(Array1DHandle a, Array1DHandle b, Array1DHandle product);
/* One root per start value: Newton from each real start, then Bairstow on each pair of complex
 * starts (the two roots of one real quadratic factor). Empty coefficients: +20002, no roots. */
TW_API int32_t PolyRootsNtBst_head(Array1DHandle coefficients, Array1DHandle realStarts, int32_t newtonIterations,
                                   double newtonTolerance, Array1DHandle complexStarts, int32_t bairstowIterations,
                                   double bairstowTolerance, Array1DHandle roots);
/* All roots over the coefficients, zero roots first; option: iteration limit per root (below 1: 100). */
TW_API int32_t CxPolyRoots_head(Array1DHandle coefficients, int32_t* option, int32_t* status);
/* Distinct roots with their multiplicities; option: the inner root finder's limit (below 1: 100),
 * tolerance 0 or below: 1e-10. Real coefficients list a complex pair side by side, positive
 * imaginary part first. residual: ||c - lead prod (x - r)^m|| / ||c||. */
TW_API int32_t MultPolyRoots_head(Array1DHandle coefficients, int32_t option, double tolerance, Array1DHandle roots,
                                  double* residual, Array1DHandle multiplicities);
TW_API int32_t CxMultPolyRoots_head(Array1DHandle coefficients, int32_t option, double tolerance,
                                    Array1DHandle roots, double* residual, Array1DHandle multiplicities);
/* Monic greatest common divisor g with a = g quotientA, b = g quotientB; tolerance 0 or below:
 * 1e-8. residual: max(||a - g qa|| / ||a||, ||b - g qb|| / ||b||). */
TW_API int32_t PolyGCD_H(Array1DHandle a, Array1DHandle b, double tolerance, Array1DHandle gcd,
                         Array1DHandle quotientA, Array1DHandle quotientB, double* residual);
TW_API int32_t CxPolyGCD_H(Array1DHandle a, Array1DHandle b, double tolerance, Array1DHandle gcd,
                           Array1DHandle quotientA, Array1DHandle quotientB, double* residual);

#endif
