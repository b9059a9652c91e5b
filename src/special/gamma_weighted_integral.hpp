// (1/Gamma(a)) times the integral over t > 0 of t^(a-1) g(t), for a > 0 and g(0) = 1 with g decaying
// at least exponentially: the trapezoidal rule after t = exp(pi/2 sinh s), halving the step until
// the sum settles. Below a = 1 the mass near t = 0 reaches beyond any cut-off, so the part
// Gamma(a) = integral of t^(a-1) e^(-t) is taken out in closed form and only the difference summed.
// logG(t) returns ln g(t).
#pragma once

#include <cmath>

#include "special/gamma.hpp"
#include "special/special_frame.hpp"

namespace tw {

template <class LogG>
double GammaWeightedIntegral(double a, LogG logG) {
    const double lg = LnGammaFunc(a);
    const bool split = a < 1.0;
    auto term = [&](double s) {
        // sinh and cosh from one exponential: the nodes move by rounding only, and the weights
        // move with them.
        const double es = std::exp(s), inv = 1.0 / es;
        const double ls = kPiOver2 * 0.5 * (es - inv);
        const double t = std::exp(ls);
        const double jacobian = kPiOver2 * 0.5 * (es + inv);
        const double base = a * ls - lg;
        if (split) {
            const double q = logG(t) + t;  // ln(g(t) e^t)
            if (std::fabs(q) < 1.0) return std::exp(base - t) * std::expm1(q) * jacobian;
            return (std::exp(base + q - t) - std::exp(base - t)) * jacobian;
        }
        return std::exp(base + logG(t)) * jacobian;
    };
    // Sum over the nodes k h (odd k only after the first level), outward until negligible.
    auto sweep = [&](double h, int stride, double scale) {
        double sum = 0.0;
        for (int dir = -1; dir <= 1; dir += 2) {
            for (int k = (stride == 1 && dir == 1) ? 0 : 1;; k += stride) {
                const double s = dir * k * h;
                const double v = term(s);
                sum += v;
                if ((std::fabs(s) > 1.0 && std::fabs(v) <= 1e-18 * std::fabs(scale + sum)) ||
                    std::fabs(s) > 8.0) {
                    break;
                }
            }
        }
        return sum;
    };
    double h = 0.5;
    double total = sweep(h, 1, 0.0);
    double value = total * h;
    for (int level = 0; level < 8; ++level) {
        h *= 0.5;
        total += sweep(h, 2, total);
        const double next = total * h;
        // Each halving of the step about doubles the correct digits: a change below 1e-10 leaves
        // an error near 1e-20, far below the rounding of the sum.
        const bool done = std::fabs(next - value) <= 1e-10 * std::fabs(next);
        value = next;
        if (done && level >= 1) break;
    }
    return split ? 1.0 + value : value;
}

}  // namespace tw
