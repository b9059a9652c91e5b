// Closed Newton-Cotes integration of uniformly sampled data. Methods: 0 trapezoid, 1 Simpson,
// 2 Simpson 3/8, 3 Bode; the later generation adds 4 left and 5 right rectangle.
//
// The older generation starts its panels at sample 0 and closes the leftover intervals at the end
// with lower rules; the later one puts the leftover at the start, under rules of the main rule's
// order, so that it is exact on the same polynomials.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

enum class IntegrationRules { Older, LeftoverAtStart };

// n >= 1; h = |dt|. Checks the method and the minimum length in the order of its generation
// (older: method then size; later: size then method).
Status Integrate1D(const double* x, int32_t n, double dt, int32_t method, IntegrationRules rules,
                   double* result);

// Each row (cols samples, step spacing[0]) integrated, then the row results (step spacing[1]).
// Dimensions and method are checked by the caller; a row too short for the method's rule is the
// 1-D status.
Status Integrate2D(const double* x, int32_t rows, int32_t cols, const double* spacing, int32_t method,
                   IntegrationRules rules, double* result);

// d2 slabs of d0 by d1, each as in 2-D with spacing[0] and spacing[1], then the slab results with
// spacing[2].
Status Integrate3D(const double* x, int32_t d0, int32_t d1, int32_t d2, const double* spacing,
                   int32_t method, IntegrationRules rules, double* result);

}  // namespace tw
