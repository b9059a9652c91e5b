#include "numeric/coordinates.hpp"

#include <cmath>

namespace tw {
namespace {

// Axes (0 X, 1 Y, 2 Z) of the first, second and third angle.
constexpr int kAxes[12][3] = {{0, 1, 2}, {0, 2, 1}, {1, 0, 2}, {1, 2, 0}, {2, 0, 1}, {2, 1, 0},
                              {0, 1, 0}, {0, 2, 0}, {1, 0, 1}, {1, 2, 1}, {2, 0, 2}, {2, 1, 2}};

constexpr double kPi = 3.141592653589793;
constexpr double kToDegrees = 180 / 3.141592653589793;
constexpr double kToRadians = 3.141592653589793 / 180;

struct Matrix3 {
    double a[3][3];
};

// Rotation of the frame by t about `axis`: 1 on the axis, (c, s; -s, c) on the two others
// taken in cyclic order.
Matrix3 AxisRotation(int axis, double t) {
    Matrix3 r{};
    const int p = (axis + 1) % 3, q = (axis + 2) % 3;
    const double c = std::cos(t), s = std::sin(t);
    r.a[axis][axis] = 1;
    r.a[p][p] = c;
    r.a[p][q] = s;
    r.a[q][p] = -s;
    r.a[q][q] = c;
    return r;
}

Matrix3 Product(const Matrix3& x, const Matrix3& y) {
    Matrix3 r{};
    for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j) r.a[i][j] = x.a[i][0] * y.a[0][j] + x.a[i][1] * y.a[1][j] + x.a[i][2] * y.a[2][j];
    return r;
}

}  // namespace

Status EulerToDirection(double alpha, double beta, double gamma, int32_t sequence, double m[9]) {
    if (static_cast<uint32_t>(sequence) > 11) return InvalidSelectorErr;
    const int* axes = kAxes[sequence];
    const Matrix3 r = Product(Product(AxisRotation(axes[2], gamma), AxisRotation(axes[1], beta)),
                              AxisRotation(axes[0], alpha));
    for (int i = 0; i < 9; ++i) m[i] = r.a[i / 3][i % 3];
    return 0;
}

// Expanding M = R3 R2 R1 for axes i (first), j (second) and k (the remaining one), with e = +1
// when (i, j, k) is a cyclic order of (X, Y, Z) and -1 otherwise:
//   three axes (k third):  M[k][i] = e sin b, M[i][i] = cos b cos g, M[j][i] = -e cos b sin g,
//                          M[k][k] = cos a cos b, M[k][j] = -e sin a cos b;
//   repeated axis (i third): M[i][i] = cos b, M[i][j] = sin a sin b, M[i][k] = -e cos a sin b,
//                          M[j][i] = sin b sin g, M[k][i] = e sin b cos g.
// At a pivot of magnitude exactly 1 the first and third angles share one rotation: the third is
// taken as 0, and then column j of M is that of the first rotation alone,
// M[j][j] = cos a, M[j][k] = e sin a, in both families.
Status DirectionToEuler(const double m[9], int32_t sequence, double* alpha, double* beta, double* gamma) {
    if (static_cast<uint32_t>(sequence) > 11) return InvalidSelectorErr;
    const int i = kAxes[sequence][0], j = kAxes[sequence][1], k = 3 - i - j;
    const double e = j == (i + 1) % 3 ? 1 : -1;
    const auto at = [m](int r, int c) { return m[3 * r + c]; };
    if (sequence < 6) {
        const double pivot = e * at(k, i);
        if (std::fabs(pivot) == 1) {
            *beta = pivot > 0 ? kPi / 2 : -kPi / 2;
            *gamma = 0;
            *alpha = std::atan2(e * at(j, k), at(j, j));
        } else {
            *beta = std::atan2(pivot, std::sqrt(at(i, i) * at(i, i) + at(j, i) * at(j, i)));
            *gamma = std::atan2(-e * at(j, i), at(i, i));
            *alpha = std::atan2(-e * at(k, j), at(k, k));
        }
    } else {
        const double pivot = at(i, i);
        if (std::fabs(pivot) == 1) {
            *beta = pivot == 1 ? 0 : kPi;
            *gamma = 0;
            *alpha = std::atan2(e * at(j, k), at(j, j));
        } else {
            *beta = std::atan2(std::sqrt(at(i, j) * at(i, j) + at(i, k) * at(i, k)), pivot);
            *alpha = std::atan2(at(i, j), -e * at(i, k));
            *gamma = std::atan2(at(j, i), e * at(k, i));
        }
    }
    return 0;
}

void Rotate2D(const double* x, const double* y, int32_t n, double angle, double* nx, double* ny) {
    const double c = std::cos(angle), s = std::sin(angle);
    for (int32_t i = 0; i < n; ++i) {
        const double xi = x[i], yi = y[i];
        nx[i] = xi * c + yi * s;
        ny[i] = yi * c - xi * s;
    }
}

void Rotate3D(const double* x, const double* y, const double* z, int32_t n, const double m[9], double* nx,
              double* ny, double* nz) {
    const double m0 = m[0], m1 = m[1], m2 = m[2], m3 = m[3], m4 = m[4], m5 = m[5], m6 = m[6], m7 = m[7],
                 m8 = m[8];
    for (int32_t i = 0; i < n; ++i) {
        const double xi = x[i], yi = y[i], zi = z[i];
        nx[i] = m0 * xi + m1 * yi + m2 * zi;
        ny[i] = m3 * xi + m4 * yi + m5 * zi;
        nz[i] = m6 * xi + m7 * yi + m8 * zi;
    }
}

Status ConvertCoordinates(const double* a, const double* b, const double* c, int32_t n, uint16_t conversion,
                          uint16_t unit, double* first, double* second, double* third) {
    if (conversion > 3 || unit > 1) return InvalidSelectorErr;
    const bool degrees = unit == 1;
    for (int32_t i = 0; i < n; ++i) {
        const double u = a[i], v = b[i], w = c[i];
        switch (conversion) {
            case 0: {
                const double theta = std::atan2(v, u), phi = std::atan2(std::sqrt(u * u + v * v), w);
                first[i] = std::sqrt(u * u + v * v + w * w);
                second[i] = degrees ? theta * kToDegrees : theta;
                third[i] = degrees ? phi * kToDegrees : phi;
                break;
            }
            case 1: {
                const double theta = degrees ? v * kToRadians : v, phi = degrees ? w * kToRadians : w;
                first[i] = u * std::sin(phi) * std::cos(theta);
                second[i] = u * std::sin(phi) * std::sin(theta);
                third[i] = u * std::cos(phi);
                break;
            }
            case 2: {
                const double theta = std::atan2(v, u);
                first[i] = std::sqrt(u * u + v * v);
                second[i] = degrees ? theta * kToDegrees : theta;
                third[i] = w;
                break;
            }
            default: {
                const double theta = degrees ? v * kToRadians : v;
                first[i] = u * std::cos(theta);
                second[i] = u * std::sin(theta);
                third[i] = w;
                break;
            }
        }
    }
    return 0;
}

}  // namespace tw
