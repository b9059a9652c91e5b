// Cosines of a window by rotating a phasor instead of calling cos in the loop.
#pragma once

#include <cmath>
#include <cstdint>
#include <numbers>

namespace tw {

// A rotation by theta = 2 pi j / n held as (2 sin^2(theta / 2), sin(theta)): the small first term
// keeps the recurrence accurate where cos(theta) is close to 1.
struct Rotation {
    double a;
    double b;
};

inline Rotation RotationOf(int32_t j, int32_t n) {
    const double h = std::sin(j * std::numbers::pi / n);
    return {2 * h * h, std::sin(2 * j * std::numbers::pi / n)};
}

inline void Rotate(double& c, double& s, Rotation r) {
    const double c1 = c - (c * r.a + s * r.b);
    s = s - (s * r.a - c * r.b);
    c = c1;
}

}  // namespace tw
