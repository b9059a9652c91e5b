#include <cmath>

#include "frame/frame.hpp"
#include "numeric/coordinates.hpp"
#include "twanlys/numeric.h"

using namespace tw;

namespace {

// The frame of the point-wise exports: K inputs of equal length in, K outputs of that length.
// The empty test comes before the length test; `prepare` runs its own checks before any output
// is resized, `core` then fills them. Outputs are resized before the inputs are viewed, so that
// an output handle that is also an input is worked on in place rather than read after it moved.
template <int K, class Prepare, class Core>
Status Points(Handle const (&in)[K], Handle* const (&out)[K], Prepare prepare, Core core) {
    Frame f;
    for (Handle* h : out) f.Output<double>(*h);
    int32_t n = Count(in[0]);
    bool empty = false, unequal = false;
    for (Handle h : in) {
        empty = empty || Count(h) < 1;
        unequal = unequal || Count(h) != n;
    }
    const double* x[K] = {};
    double* y[K] = {};
    Status s = empty ? EmptyArrayErr : unequal ? SizeMismatchErr : prepare();
    for (int k = 0; k < K && s == 0; ++k)
        if (f.Resize(*out[k], n, &y[k]) != 0) s = OutOfMemoryErr;
    for (int k = 0; k < K && s == 0; ++k) s = f.In(in[k], &x[k]);
    if (s == 0) s = core(x, y, n);
    return f.Finish(s);
}

constexpr auto kNoChecks = [] { return Status{0}; };

Status Shift(Handle const (&in)[3], const double (&d)[3], Handle* const (&out)[3]) {
    return Points<3>(in, out, kNoChecks, [&](const double* const (&x)[3], double* const (&y)[3], int32_t n) {
        for (int k = 0; k < 3; ++k)
            for (int32_t i = 0; i < n; ++i) y[k][i] = x[k][i] + d[k];
        return 0;
    });
}

Status Shift2(Handle const (&in)[2], const double (&d)[2], Handle* const (&out)[2]) {
    return Points<2>(in, out, kNoChecks, [&](const double* const (&x)[2], double* const (&y)[2], int32_t n) {
        for (int k = 0; k < 2; ++k)
            for (int32_t i = 0; i < n; ++i) y[k][i] = x[k][i] + d[k];
        return 0;
    });
}

Status RotateByMatrix(Handle const (&in)[3], Handle* const (&out)[3], double (&m)[9], auto&& prepare) {
    return Points<3>(in, out, prepare, [&](const double* const (&x)[3], double* const (&y)[3], int32_t n) {
        Rotate3D(x[0], x[1], x[2], n, m, y[0], y[1], y[2]);
        return 0;
    });
}

Status Euler(Handle x, Handle y, Handle z, double alpha, double beta, double gamma, int32_t sequence,
             Handle& nx, Handle& ny, Handle& nz) {
    double m[9];
    return RotateByMatrix({x, y, z}, {&nx, &ny, &nz}, m,
                          [&] { return EulerToDirection(alpha, beta, gamma, sequence, m); });
}

Status ToDirection(double alpha, double beta, double gamma, int32_t sequence, Handle& matrix) {
    Frame f;
    f.Output2D<double>(matrix);
    double m[9];
    double* out = nullptr;
    Status s = EulerToDirection(alpha, beta, gamma, sequence, m);
    if (s == 0 && f.Resize2D(matrix, 3, 3, &out) != 0) s = OutOfMemoryErr;
    if (s == 0)
        for (int i = 0; i < 9; ++i) out[i] = m[i];
    return f.Finish(s);
}

Status FromDirection(Handle matrix, int32_t sequence, double* alpha, double* beta, double* gamma) {
    Frame f;
    f.Result(alpha);
    f.Result(beta);
    f.Result(gamma);
    const Shape d = Dims(matrix);
    const double* m = nullptr;
    Status s = (d.rows != 3 || d.cols != 3) ? SizeMismatchErr : f.In2D(matrix, &m);
    if (s == 0) s = DirectionToEuler(m, sequence, alpha, beta, gamma);
    return f.Finish(s);
}

}  // namespace

TW_API int32_t CartesianShift2D_head(Array1DHandle x, Array1DHandle y, double dx, double dy, Array1DHandle newX,
                                     Array1DHandle newY) {
    return Shift2({x, y}, {dx, dy}, {&newX, &newY});
}

TW_API int32_t CartesianShift3D_head(Array1DHandle x, Array1DHandle y, Array1DHandle z, double dx, double dy,
                                     double dz, Array1DHandle newX, Array1DHandle newY, Array1DHandle newZ) {
    return Shift({x, y, z}, {dx, dy, dz}, {&newX, &newY, &newZ});
}

TW_API int32_t CoordRotation2D_head(Array1DHandle x, Array1DHandle y, double angle, Array1DHandle newX,
                                    Array1DHandle newY) {
    return Points<2>({x, y}, {&newX, &newY}, kNoChecks,
                     [&](const double* const (&p)[2], double* const (&q)[2], int32_t n) {
                         Rotate2D(p[0], p[1], n, angle, q[0], q[1]);
                         return 0;
                     });
}

TW_API int32_t CoordRotationEuler_head(Array1DHandle x, Array1DHandle y, Array1DHandle z, double alpha,
                                       double beta, double gamma, Array1DHandle newX, Array1DHandle newY,
                                       Array1DHandle newZ) {
    return Euler(x, y, z, alpha, beta, gamma, 10, newX, newY, newZ);
}

TW_API int32_t CoordRotationEuler2011_head(Array1DHandle x, Array1DHandle y, Array1DHandle z, double alpha,
                                           double beta, double gamma, int32_t sequence, Array1DHandle newX,
                                           Array1DHandle newY, Array1DHandle newZ) {
    return Euler(x, y, z, alpha, beta, gamma, sequence, newX, newY, newZ);
}

TW_API int32_t CoordRotationDirect_head(Array1DHandle x, Array1DHandle y, Array1DHandle z, Array2DHandle matrix,
                                        uint16_t kind, Array1DHandle newX, Array1DHandle newY,
                                        Array1DHandle newZ) {
    double m[9];
    return RotateByMatrix({x, y, z}, {&newX, &newY, &newZ}, m, [&] {
        const Shape d = Dims(matrix);
        if (d.rows != 3 || d.cols != 3) return Status{SizeMismatchErr};
        if (kind > 1) return Status{InvalidSelectorErr};
        // The block's elements may be only 4-byte aligned: copied bytewise.
        std::memcpy(m, static_cast<const unsigned char*>(*matrix) + 8, sizeof m);
        // Kind 0 holds the angles between the axes.
        if (kind == 0)
            for (double& v : m) v = std::cos(v);
        return Status{0};
    });
}

TW_API int32_t Euler2Direction_head(double alpha, double beta, double gamma, Array2DHandle matrix) {
    return ToDirection(alpha, beta, gamma, 10, matrix);
}

TW_API int32_t Euler2Direction2011_head(double alpha, double beta, double gamma, int32_t sequence,
                                        Array2DHandle matrix) {
    return ToDirection(alpha, beta, gamma, sequence, matrix);
}

TW_API int32_t Direction2Euler_head(Array2DHandle matrix, double* alpha, double* beta, double* gamma) {
    return FromDirection(matrix, 10, alpha, beta, gamma);
}

TW_API int32_t Direction2Euler2011_head(Array2DHandle matrix, int32_t sequence, double* alpha, double* beta,
                                        double* gamma) {
    return FromDirection(matrix, sequence, alpha, beta, gamma);
}

TW_API int32_t CoordConversion_head(Array1DHandle a, Array1DHandle b, Array1DHandle c, uint16_t conversion,
                                    uint16_t unit, Array1DHandle first, Array1DHandle second,
                                    Array1DHandle third) {
    return Points<3>({a, b, c}, {&first, &second, &third},
                     [&] { return Status{conversion > 3 || unit > 1 ? InvalidSelectorErr : 0}; },
                     [&](const double* const (&p)[3], double* const (&q)[3], int32_t n) {
                         return ConvertCoordinates(p[0], p[1], p[2], n, conversion, unit, q[0], q[1], q[2]);
                     });
}
