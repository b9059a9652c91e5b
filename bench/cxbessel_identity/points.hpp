// The points both dumps visit: a fixed pseudo-random sequence, the same on every machine.
#pragma once

#include <cmath>
#include <cstdint>

namespace points {

struct Cx {
    double re, im;
};

inline uint64_t g_state = 0x9e3779b97f4a7c15ull;
inline uint64_t Next() {  // splitmix64
    uint64_t z = (g_state += 0x9e3779b97f4a7c15ull);
    z = (z ^ (z >> 30)) * 0xbf58476d1ce4e5b9ull;
    z = (z ^ (z >> 27)) * 0x94d049bb133111ebull;
    return z ^ (z >> 31);
}
inline double Uniform() { return static_cast<double>(Next() >> 11) * 0x1.0p-53; }

// Orders 0..160: integers, half-integers, values within 1/2 of 86, and anything in between.
inline double Order() {
    const uint64_t k = Next() % 4;
    const double n = static_cast<double>(Next() % 161);
    if (k == 0) return n;
    if (k == 1) return n < 160.0 ? n + 0.5 : 159.5;
    if (k == 2) return 85.5 + Uniform();
    return 160.0 * Uniform();
}

// |z| log-uniform over 1e-8..1e4, any angle; one point in eight on an axis, exactly.
inline Cx Point() {
    const double r = std::pow(10.0, -8.0 + 12.0 * Uniform());
    const uint64_t k = Next() % 16;
    switch (k) {
        case 0:
            return {r, 0.0};
        case 1:
            return {-r, 0.0};
        case 2:
            return {0.0, r};
        case 3:
            return {0.0, -r};
        default:
            break;
    }
    const double t = 2.0 * 3.141592653589793 * Uniform() - 3.141592653589793;
    return {r * std::cos(t), r * std::sin(t)};
}

}  // namespace points
