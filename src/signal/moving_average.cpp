#include "signal/moving_average.hpp"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace tw {

template <class T>
int32_t DecimatedMovingSum(T* x, int32_t n, int32_t factor, T* sum, int32_t* count) {
    int32_t produced = 0, taken = *count;
    T s = *sum;
    for (int32_t i = 0; i < n; ++i) {
        s += x[i];
        // Compared before counting, so that a carried count near the i32 limit cannot overflow.
        if (taken >= factor - 1) {
            x[produced++] = s;
            s = T{};
            taken = 0;
        } else {
            ++taken;
        }
    }
    *sum = s;
    *count = taken;
    return produced;
}

template <class T>
void CascadedMovingSum(T* x, int32_t n, int32_t stages, int32_t width, T* sums, T* window, int32_t position) {
    for (int32_t stage = 0; stage < stages; ++stage) {
        T* cells = window + static_cast<size_t>(stage) * static_cast<size_t>(width);
        T s = sums[stage];
        int32_t p = position;
        for (int32_t i = 0; i < n; ++i) {
            const T in = x[i];
            s += in - cells[p];
            cells[p] = in;
            x[i] = s;
            if (++p == width) p = 0;
        }
        sums[stage] = s;
    }
}

Status MovingSumStage(const double* u, int32_t n, int32_t w, int32_t mode, double gain, double* cells,
                      double* v) {
    if (n < 1) return ResampleEmptyWarn;
    if (u == v) return RateStageErr;
    double r = cells[w];
    // u[i - w] for i below w is cells[i].
    const int32_t head = std::min(n, w);
    if (mode == 0) {
        for (int32_t i = 0; i < head; ++i) v[i] = r = r + u[i] - cells[i];
        for (int32_t i = head; i < n; ++i) v[i] = r = r + u[i] - u[i - w];
    } else if (w % 2 == 0) {
        for (int32_t i = 0; i < head; ++i) v[i] = r = u[i] - r - cells[i];
        for (int32_t i = head; i < n; ++i) v[i] = r = u[i] - r - u[i - w];
    } else {
        for (int32_t i = 0; i < head; ++i) v[i] = r = u[i] - r + cells[i];
        for (int32_t i = head; i < n; ++i) v[i] = r = u[i] - r + u[i - w];
    }
    cells[w] = r;
    if (n >= w) {
        std::memcpy(cells, u + (n - w), static_cast<size_t>(w) * sizeof(double));
    } else {
        std::memmove(cells, cells + n, static_cast<size_t>(w - n) * sizeof(double));
        std::memcpy(cells + (w - n), u, static_cast<size_t>(n) * sizeof(double));
    }
    const double scale = gain * (1.0 / w);
    for (int32_t i = 0; i < n; ++i) v[i] *= scale;
    return 0;
}

int32_t CicStateCells(int32_t stages, int32_t r, int32_t d, bool decimator) {
    const int64_t cells = (int64_t{r} * d + 1) * stages + (decimator ? 1 : 0);
    return cells > INT32_MAX ? -1 : static_cast<int32_t>(cells);
}

CicPick CicDecimatorPick(int32_t n, int32_t r, int32_t delay, double phase) {
    if (delay >= n) return {0, 0, phase};
    if (delay <= 0 && phase >= n) return {0, 0, std::trunc(phase) - n};
    const int32_t first = delay > 0 ? delay : phase >= 0 ? static_cast<int32_t>(phase) : 0;
    const int32_t count = static_cast<int32_t>((int64_t{n} - first + r - 1) / r);
    return {first, count, static_cast<double>(first + int64_t{count} * r - n)};
}

namespace {

// Runs the stages ping-pong between a and b, starting from u; returns where the last one ended.
Status RunStages(const double* u, int32_t n, int32_t stages, int32_t w, int32_t mode, double* state,
                 double* a, double* b, const double** out) {
    const double* in = u;
    double* target = a;
    for (int32_t stage = 0; stage < stages; ++stage) {
        double* cells = state + static_cast<size_t>(stage) * static_cast<size_t>(w + 1);
        if (const Status s = MovingSumStage(in, n, w, mode, 1.0, cells, target)) return s;
        in = target;
        target = target == a ? b : a;
    }
    *out = in;
    return 0;
}

Status StageScratch(Scratch<double>* a, Scratch<double>* b, int64_t n, int32_t stages) {
    if (a->Allocate(static_cast<size_t>(n)) != 0) return RateStageErr;
    if (stages > 1 && b->Allocate(static_cast<size_t>(n)) != 0) return RateStageErr;
    return 0;
}

}  // namespace

Status CicDecimate(const double* x, int32_t n, int32_t stages, int32_t r, int32_t d, int32_t mode,
                   CicPick pick, double* state, int32_t* delay, double* y) {
    const int32_t w = r * d;
    Scratch<double> a, b;
    Status s = StageScratch(&a, &b, n, stages);
    const double* v = nullptr;
    if (s == 0) s = RunStages(x, n, stages, w, mode, state, a.get(), b.get(), &v);
    if (s != 0) return s;
    double& phase = state[static_cast<size_t>(w + 1) * static_cast<size_t>(stages)];
    if (*delay >= n) {
        *delay -= n;
        return MergeRelease(MergeRelease(0, b.Release()), a.Release());
    }
    for (int32_t k = 0; k < pick.count; ++k) y[k] = v[pick.first + static_cast<int64_t>(k) * r];
    phase = pick.phase;
    *delay = 0;
    return MergeRelease(MergeRelease(0, b.Release()), a.Release());
}

int32_t CicInterpolatorCount(int32_t n, int32_t r, int32_t delay) {
    const int64_t total = int64_t{n} * r;
    if (delay <= 0) return static_cast<int32_t>(total);
    return delay < total ? static_cast<int32_t>(total - delay) : 0;
}

Status CicInterpolate(const double* x, int32_t n, int32_t stages, int32_t r, int32_t d, int32_t mode,
                      double* state, int32_t* delay, double* y) {
    const int32_t w = r * d;
    const int64_t total = int64_t{n} * r;
    Scratch<double> u, a, b;
    Status s = u.Allocate(static_cast<size_t>(total)) != 0 ? RateStageErr : 0;
    if (s == 0) s = StageScratch(&a, &b, total, stages);
    if (s != 0) return s;
    std::fill(u.get(), u.get() + total, 0.0);
    for (int32_t k = 0; k < n; ++k) u[static_cast<size_t>(k) * static_cast<size_t>(r)] = r * x[k];
    const double* v = nullptr;
    s = RunStages(u.get(), static_cast<int32_t>(total), stages, w, mode, state, a.get(), b.get(), &v);
    if (s != 0) return s;
    int64_t cut = 0;
    if (*delay > 0) {
        cut = std::min<int64_t>(*delay, total);
        *delay = *delay < total ? 0 : static_cast<int32_t>(*delay - total);
    }
    std::copy(v + cut, v + total, y);
    s = MergeRelease(0, b.Release());
    s = MergeRelease(s, a.Release());
    return MergeRelease(s, u.Release());
}

#define TW_MOVING(T)                                                            \
    template int32_t DecimatedMovingSum<T>(T*, int32_t, int32_t, T*, int32_t*); \
    template void CascadedMovingSum<T>(T*, int32_t, int32_t, int32_t, T*, T*, int32_t);
TW_MOVING(double)
TW_MOVING(cdouble)
#undef TW_MOVING

}  // namespace tw
