#include "signal/calculus.hpp"

#include <cmath>

namespace tw {

namespace {

// The original samples x[i-2] .. x[i+2] around the sample i being replaced. Samples past i are
// still unwritten in x, so only the two older ones need keeping.
class Neighbours {
public:
    Neighbours(const double* x, int32_t n, const Edges& e) : x_(x), n_(n), e_(e) {
        for (int k = 0; k < 5; ++k) v_[k] = At(k - 2);
    }
    double operator()(int d) const { return v_[d + 2]; }
    void Advance() {
        for (int k = 0; k < 4; ++k) v_[k] = v_[k + 1];
        ++i_;
        v_[4] = At(i_ + 2);
    }

private:
    double At(int32_t j) const {
        if (j < 0) return e_.before[j + 2];
        if (j < n_) return x_[j];
        return j - n_ < 2 ? e_.after[j - n_] : 0.0;
    }
    const double* x_;
    int32_t n_;
    const Edges& e_;
    int32_t i_ = 0;
    double v_[5];
};

template <class Stencil>
void Replace(double* x, int32_t n, const Edges& e, Stencil stencil) {
    Neighbours w(x, n, e);
    for (int32_t i = 0; i < n; ++i) {
        x[i] = stencil(w);
        w.Advance();
    }
}

// Running sum y[i] = y[i-1] + term(i) from y[-1] = 0; the rectangle rules start at y[0] = 0.
template <class Term>
void RunningSum(double* x, int32_t n, const Edges& e, bool fromZero, Term term) {
    Neighbours w(x, n, e);
    double y = 0;
    for (int32_t i = 0; i < n; ++i) {
        if (i > 0 || !fromZero) y = y + term(w);
        x[i] = y;
        w.Advance();
    }
}

}  // namespace

Edges MakeEdges(const double* init, int32_t nInit, int32_t usedInit, const double* fin, int32_t nFinal) {
    Edges e;
    if (usedInit == 2) {
        if (nInit > 0) e.before[0] = init[0];
        if (nInit > 1) e.before[1] = init[1];
    } else if (usedInit == 1 && nInit > 0) {
        e.before[1] = init[0];
    }
    if (nFinal > 0) e.after[0] = fin[0];
    if (nFinal > 1) e.after[1] = fin[1];
    return e;
}

void DifferentiateInPlace(double* x, int32_t n, const Edges& e, double dt, int32_t method) {
    const double h = dt;
    switch (method) {
        case 0: {
            const double c = 0.5 / h;
            Replace(x, n, e, [c](const Neighbours& w) { return (w(1) - w(-1)) * c; });
            break;
        }
        case 1: {
            const double c = 1 / (12 * h);
            Replace(x, n, e, [c](const Neighbours& w) { return (8 * w(1) - w(2) - 8 * w(-1) + w(-2)) * c; });
            break;
        }
        case 2: {
            const double c = 1 / h;
            Replace(x, n, e, [c](const Neighbours& w) { return (w(1) - w(0)) * c; });
            break;
        }
        default: {
            const double c = 1 / h;
            Replace(x, n, e, [c](const Neighbours& w) { return (w(0) - w(-1)) * c; });
            break;
        }
    }
}

void IntegrateInPlace(double* x, int32_t n, const Edges& e, double dt, int32_t method) {
    switch (method) {
        case 0:
            RunningSum(x, n, e, false, [dt](const Neighbours& w) { return (w(0) + w(-1)) * dt * 0.5; });
            break;
        case 1:
            RunningSum(x, n, e, false,
                       [dt](const Neighbours& w) { return (w(1) + 4 * w(0) + w(-1)) * dt / 6; });
            break;
        case 2:
            RunningSum(x, n, e, false, [dt](const Neighbours& w) {
                return (3 * (w(0) + w(-1)) + w(-2) + w(1)) * dt * 0.125;
            });
            break;
        case 3:
            RunningSum(x, n, e, false, [dt](const Neighbours& w) {
                return (12 * w(0) + 32 * (w(-1) + w(1)) + 7 * (w(-2) + w(2))) * dt / 90;
            });
            break;
        case 4:
            RunningSum(x, n, e, true, [dt](const Neighbours& w) { return w(-1) * dt; });
            break;
        default:
            RunningSum(x, n, e, true, [dt](const Neighbours& w) { return w(0) * dt; });
            break;
    }
}

void IntegrateFromStart(double* x, int32_t n, double dt, int32_t method) {
    if (method >= 4) {
        IntegrateInPlace(x, n, Edges{}, dt, method);
        return;
    }
    // The recursion of method m spans m + 1 steps; y[1] .. y[m] come from starting formulas.
    const int32_t span = method + 1;
    double x0[5] = {0, 0, 0, 0, 0};
    for (int32_t i = 0; i < 5 && i < n; ++i) x0[i] = x[i];
    double start[4] = {0, 0, 0, 0};
    if (method == 1) {
        start[1] = (5 * x0[0] + 8 * x0[1] - x0[2]) * dt / 12;
    } else if (method == 2) {
        start[1] = (9 * x0[0] + 19 * x0[1] - 5 * x0[2] + x0[3]) * dt / 24;
        start[2] = (x0[0] + 4 * x0[1] + x0[2]) * dt / 3;
    } else if (method == 3) {
        start[1] = (251 * x0[0] + 646 * x0[1] - 264 * x0[2] + 106 * x0[3] - 19 * x0[4]) * dt / 720;
        start[2] = (29 * x0[0] + 124 * x0[1] + 24 * x0[2] + 4 * x0[3] - x0[4]) * dt / 90;
        start[3] = (27 * x0[0] + 102 * x0[1] + 72 * x0[2] + 42 * x0[3] - 3 * x0[4]) * dt / 80;
    }
    const double third = dt / 3, boole = (4 * dt) / 90;
    // Inputs already replaced by their integrals are kept here; y[i - span] is read from x.
    double old[8];
    auto was = [&old](int32_t j) { return old[j & 7]; };
    for (int32_t i = 0; i < n; ++i) {
        const double xi = x[i];
        double y;
        if (i == 0) {
            y = 0;
        } else if (i < span) {
            y = start[i];
        } else if (method == 0) {
            y = x[i - 1] + (xi + was(i - 1)) * dt * 0.5;
        } else if (method == 1) {
            y = x[i - 2] + (was(i - 2) + 4 * was(i - 1) + xi) * third;
        } else if (method == 2) {
            y = x[i - 3] + (was(i - 3) + 3 * was(i - 2) + 3 * was(i - 1) + xi) * dt * 3 * 0.125;
        } else {
            y = x[i - 4] +
                (7 * was(i - 4) + 32 * was(i - 3) + 12 * was(i - 2) + 32 * was(i - 1) + 7 * xi) * boole;
        }
        old[i & 7] = xi;
        x[i] = y;
    }
}

void UnwrapInPlace(double* x, int32_t n, int32_t units) {
    const bool degreesIn = units == 2 || units == 3;
    const double period = degreesIn ? 360.0 : kTwoPi;
    for (int32_t i = 1; i < n; ++i) x[i] = x[i] - period * std::floor((x[i] - x[i - 1]) / period + 0.5);
    if (units == 1)
        for (int32_t i = 0; i < n; ++i) x[i] = x[i] * 360 / kTwoPi;
    else if (units == 3)
        for (int32_t i = 0; i < n; ++i) x[i] = x[i] * kTwoPi / 360;
}

}  // namespace tw
