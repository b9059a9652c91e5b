// Point-wise coordinate operations: rotations, Euler angles and direction cosines, and the
// changes between rectangular, spherical and cylindrical coordinates.
//
// Rotations are those of a rotated frame (passive). An Euler sequence 0..11 names the axes of
// the three angles (XYZ XZY YXZ YZX ZXY ZYX XYX XZX YXY YZY ZXZ ZYZ); the direction cosine matrix
// is M = R3 R2 R1, row-major, and a point maps as new = M old.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

// -20061 for a sequence outside 0..11 (read unsigned).
Status EulerToDirection(double alpha, double beta, double gamma, int32_t sequence, double m[9]);
Status DirectionToEuler(const double m[9], int32_t sequence, double* alpha, double* beta, double* gamma);

void Rotate2D(const double* x, const double* y, int32_t n, double angle, double* nx, double* ny);
void Rotate3D(const double* x, const double* y, const double* z, int32_t n, const double m[9], double* nx,
              double* ny, double* nz);

// conversion 0: (x, y, z) to (r, theta, phi); 1 back; 2: (x, y, z) to (rho, theta, z); 3 back.
// unit 0 radians, 1 degrees. -20061 for any other selector.
Status ConvertCoordinates(const double* a, const double* b, const double* c, int32_t n, uint16_t conversion,
                          uint16_t unit, double* first, double* second, double* third);

}  // namespace tw
