#include <algorithm>
#include <cstring>
#include <numeric>

#include "frame/frame.hpp"
#include "signal/resample.hpp"
#include "twanlys/signal.h"

using namespace tw;

namespace {

template <class T>
Status ResizeRows(Frame& f, Handle& h, bool multi, int32_t rows, int32_t cols, T** data) {
    const Status s = multi ? f.Resize2D(h, rows, cols, data) : f.Resize(h, cols, data);
    return s == 0 ? 0 : OutOfMemoryErr;
}

// One timing for every row; a 1-D call is the single-row case.
template <class T, bool Multi>
Status RationalResample(Handle x, int32_t l, int32_t m, int32_t reset, int32_t* delay, Handle h,
                        Handle& state, int32_t* stateCount, Handle& y) {
    Frame f;
    if constexpr (Multi) {
        f.Output2D<T>(y);
        f.Output2D<T>(state);
    } else {
        f.Output<T>(y);
        f.Output<T>(state);
    }
    const Shape xd = Multi ? Dims(x) : Shape{1, Count(x)};
    const Shape sd = Multi ? Dims(state) : Shape{1, Count(state)};
    const int32_t taps = Count(h);
    Status s = *delay < 0 || *stateCount < 0        ? NegativeArgumentErr
               : l < 1 || m < 1                     ? BadDataRangeErr
               : taps < 1 || taps % 2 == 0          ? EvenTapsErr
               : std::gcd(l, m) != 1                ? DomainSingularityErr
               : sd.rows != xd.rows && sd.rows != 0 ? SizeMismatchErr
                                                    : 0;
    // A state without rows is created as on a reset.
    const bool fresh = reset != 0 || sd.rows == 0;
    if (s == 0 && !fresh && *stateCount > sd.cols) s = DomainSingularityErr;
    if (s != 0) return f.Finish(s);

    const int32_t rows = xd.rows, n = xd.cols, live = fresh ? 0 : *stateCount;
    const int32_t cells = RationalStateCells(taps, l);
    RationalPlan plan{};
    s = PlanRationalBlock(n, live, l, m, taps, *delay, cells, &plan);
    const T *xs = nullptr, *ss = nullptr;
    const double* hs = nullptr;
    if (s == 0) s = Multi ? f.In2D(x, &xs) : f.In(x, &xs);
    if (s == 0) s = Multi ? f.In2D(state, &ss) : f.In(state, &ss);
    if (s == 0) s = f.In(h, &hs);
    const size_t total = static_cast<size_t>(live) + static_cast<size_t>(n);
    Scratch<double> poly;
    Scratch<int32_t> start;
    Scratch<T> past, v;
    if (s == 0) s = poly.Allocate(static_cast<size_t>(taps));
    if (s == 0) s = start.Allocate(static_cast<size_t>(std::min(l, taps)) + 1);
    if (s == 0) s = past.Allocate(static_cast<size_t>(rows) * static_cast<size_t>(live));
    if (s == 0) s = v.Allocate(total);
    if (s == 0) {
        PolyphaseSplit(hs, taps, l, poly.get(), start.get());
        // The live cells are copied out before the state is resized.
        for (int32_t r = 0; r < rows; ++r)
            std::copy_n(ss + static_cast<size_t>(r) * static_cast<size_t>(sd.cols), live,
                        past.get() + static_cast<size_t>(r) * static_cast<size_t>(live));
    }
    T *ys = nullptr, *st = nullptr;
    if (s == 0) s = ResizeRows(f, y, Multi, rows, plan.count, &ys);
    if (s == 0) s = ResizeRows(f, state, Multi, rows, cells, &st);
    for (int32_t r = 0; s == 0 && r < rows; ++r) {
        const size_t row = static_cast<size_t>(r);
        std::copy_n(past.get() + row * static_cast<size_t>(live), live, v.get());
        std::copy_n(xs + row * static_cast<size_t>(n), n, v.get() + live);
        RationalFilter(v.get(), poly.get(), start.get(), taps, l, m, *delay, plan.count,
                       ys + row * static_cast<size_t>(plan.count));
        T* cellsOut = st + row * static_cast<size_t>(cells);
        std::copy_n(v.get() + plan.drop, plan.keep, cellsOut);
        std::fill(cellsOut + plan.keep, cellsOut + cells, T{});
    }
    s = MergeRelease(s, v.Release());
    s = MergeRelease(s, past.Release());
    s = MergeRelease(s, start.Release());
    s = MergeRelease(s, poly.Release());
    s = f.Finish(s);
    if (s == 0) *delay = plan.delay, *stateCount = plan.keep;
    return s;
}

}  // namespace

TW_API int32_t RationalResample_H(Array1DHandle x, int32_t L, int32_t M, int32_t reset, int32_t* delay,
                                  Array1DHandle h, Array1DHandle state, int32_t* stateCount,
                                  Array1DHandle y) {
    return RationalResample<double, false>(x, L, M, reset, delay, h, state, stateCount, y);
}

TW_API int32_t CxRationalResample_H(Array1DHandle x, int32_t L, int32_t M, int32_t reset, int32_t* delay,
                                    Array1DHandle h, Array1DHandle state, int32_t* stateCount,
                                    Array1DHandle y) {
    return RationalResample<cdouble, false>(x, L, M, reset, delay, h, state, stateCount, y);
}

TW_API int32_t RationalResampleMultiCh_H(Array2DHandle x, int32_t L, int32_t M, int32_t reset, int32_t* delay,
                                         Array1DHandle h, Array2DHandle state, int32_t* stateCount,
                                         Array2DHandle y) {
    return RationalResample<double, true>(x, L, M, reset, delay, h, state, stateCount, y);
}

TW_API int32_t CxRationalResampleMCh_H(Array2DHandle x, int32_t L, int32_t M, int32_t reset, int32_t* delay,
                                       Array1DHandle h, Array2DHandle state, int32_t* stateCount,
                                       Array2DHandle y) {
    return RationalResample<cdouble, true>(x, L, M, reset, delay, h, state, stateCount, y);
}
