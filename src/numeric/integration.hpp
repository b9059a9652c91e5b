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

// The rule of `method` (0..5) over n samples, h = |dt|. n is at least 3, or at least 2 for the
// trapezoid, the rectangles and the older rules; the later Bode rule needs 5.
double IntegrateSamples(const double* x, int32_t n, double dt, int32_t method, IntegrationRules rules);

// The 1-D entry: the method and the minimum length checked in the order of the generation
// (older: method, then size; later: size, then method), then IntegrateSamples.
Status Integrate1D(const double* x, int32_t n, double dt, int32_t method, IntegrationRules rules,
                   double* result);

// d2 slabs of d0 rows by d1 columns: each row with step spacing[0], the row results with
// spacing[1], then the slab results with spacing[2]; d2 = 1 is the plain 2-D integral.
// Dimensions and method are checked by the caller.
Status IntegrateGrid(const double* x, int32_t d0, int32_t d1, int32_t d2, const double* spacing, int32_t method,
                     IntegrationRules rules, double* result);

}  // namespace tw
