// Derivative, running integrals and phase unwrapping, in place on plain arrays.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

inline constexpr double kPi = 3.141592653589793;
inline constexpr double kTwoPi = 2 * kPi;

// The samples around a block: before = {x[-2], x[-1]}, after = {x[n], x[n+1]}.
struct Edges {
    double before[2] = {0, 0};
    double after[2] = {0, 0};
};

// Edges from the caller's boundary arrays. With two init samples used they are x[-2], x[-1];
// with one, init[0] is x[-1]. Samples the arrays do not hold read as 0.
Edges MakeEdges(const double* init, int32_t nInit, int32_t usedInit, const double* fin, int32_t nFinal);

// Methods 0..3; the caller has checked the method.
void DifferentiateInPlace(double* x, int32_t n, const Edges& e, double dt, int32_t method);
// Methods 0..5 of the boundary form.
void IntegrateInPlace(double* x, int32_t n, const Edges& e, double dt, int32_t method);
// Methods 0..5 without boundaries; n is at least method + 2 (2 for methods 4, 5).
void IntegrateFromStart(double* x, int32_t n, double dt, int32_t method);

void UnwrapInPlace(double* x, int32_t n, int32_t units);

}  // namespace tw
