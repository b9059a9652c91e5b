#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <numeric>

#include "frame/frame.hpp"
#include "signal/resample.hpp"
#include "twanlys/signal.h"

using namespace tw;

static_assert(sizeof(ResampleState) == 60 && sizeof(ResampleSettings) == 32 &&
              sizeof(VariableSettings) == 17);

namespace {

// The records are packed and may sit at any address: they are copied whole, and their fields
// are only read and written by value (never through a pointer or reference to a field).
template <class R>
R Load(const R* record) {
    R r;
    std::memcpy(&r, record, sizeof r);
    return r;
}

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

Table TableOf(const double* cells, int32_t size, int32_t oversample, int32_t interpolation) {
    return {cells, size, oversample, interpolation};
}

Status TableChecks(Handle table, int32_t oversample) {
    return Count(table) < 1 ? EmptyArrayErr : oversample < 1 ? BadDataRangeErr : 0;
}

template <class T>
Status ResampleConst(Handle x, ResampleState* record, const ResampleSettings* settingsRecord, int32_t reset,
                     Handle& y, int32_t* produced, int32_t antiAlias) {
    const ResampleSettings settings = Load(settingsRecord);
    ResampleState state = Load(record);
    Handle buffer = state.buffer, coefs = state.coefs;
    ConstResampler st{state.count,         state.scale, state.left, state.right,
                      state.interpolation, state.ratio, state.frac, state.index};
    Frame f;
    f.Output<T>(y);
    f.Output<T>(buffer);
    f.Output<double>(coefs);
    const Handle table = settings.table;
    Status s = TableChecks(table, settings.oversample);
    const double ratio = reset != 0 ? settings.ratio : st.ratio;
    if (s == 0 && !(ratio > 0 && std::isfinite(ratio))) s = BadDataRangeErr;
    if (s == 0 && reset != 0 && !(std::fabs(settings.start) < 2147483647.0)) s = BadDataRangeErr;
    // A carried fraction outside [0, 1) is no state a call leaves; it would place the filter
    // anywhere.
    if (s == 0 && reset == 0 && !(st.frac >= 0 && st.frac < 1)) s = BadDataRangeErr;
    const double* cells = nullptr;
    if (s == 0) s = f.In(table, &cells);
    Table t = TableOf(cells, Count(table), settings.oversample,
                      reset != 0 ? settings.interpolation : st.interpolation);
    T* bs = nullptr;
    double* cs = nullptr;
    if (s == 0 && reset != 0) {
        const TablePositions reach = TableReach(t, ratio, 0.0);
        const int32_t capacity = TableWidth(t, ratio);
        s = f.Resize(buffer, capacity, &bs) == 0 ? 0 : OutOfMemoryErr;
        if (s == 0) s = f.Resize(coefs, capacity, &cs) == 0 ? 0 : OutOfMemoryErr;
        const double whole = std::trunc(settings.start);
        st = {0,
              reach.scale,
              reach.left,
              reach.right,
              t.interpolation,
              ratio,
              settings.start - whole,
              static_cast<int32_t>(whole)};
    } else if (s == 0) {
        s = f.InPlace(buffer, &bs);
        if (s == 0) s = f.InPlace(coefs, &cs);
        if (s == 0 && (st.count < 0 || st.count > Count(buffer))) s = BufferTooSmallErr;
    }
    const int32_t n = Count(x);
    const int64_t total = int64_t{st.count} + n;
    const double capacity = s == 0 ? std::ceil(static_cast<double>(total) / ratio) : 0;
    if (s == 0 && capacity > INT32_MAX) s = OutOfMemoryErr;
    const T* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    T* ys = nullptr;
    if (s == 0) s = f.Resize(y, static_cast<int32_t>(capacity), &ys) == 0 ? 0 : OutOfMemoryErr;
    Scratch<T> v;
    if (s == 0) s = v.Allocate(static_cast<size_t>(total));
    int32_t made = 0;
    int64_t drop = 0;
    if (s == 0) {
        std::copy_n(bs, st.count, v.get());
        std::copy_n(xs, n, v.get() + st.count);
        // Without anti-aliasing the filter stays at the input rate.
        const double filterRatio = antiAlias != 0 ? ratio : std::min(ratio, 1.0);
        s = ResampleConstBlock(t, filterRatio, v.get(), total, &st, cs, Count(coefs), ys,
                               static_cast<int32_t>(capacity), &made, &drop);
    }
    if (s == 0 && total - drop > Count(buffer)) s = BufferTooSmallErr;
    if (s == 0) {
        std::copy(v.get() + drop, v.get() + total, bs);
        st.count = static_cast<int32_t>(total - drop);
    }
    s = f.Finish(MergeRelease(s, v.Release()));
    if (s < 0) st = {}, made = 0;
    *produced = made;
    state = {buffer,   st.count,         coefs,    st.scale, st.left,
             st.right, st.interpolation, st.ratio, st.frac,  st.index};
    std::memcpy(record, &state, sizeof state);
    return s;
}

template <class T, bool Multi>
Status ResampleVariable(Handle x, Handle* y, Handle& times, const VariableSettings* settingsRecord,
                        double* last, int32_t* done, int32_t* consumed) {
    // The single-channel form writes its outputs over the times, which are T; the multi-channel
    // one keeps f64 times.
    using Time = std::conditional_t<Multi, double, T>;
    const VariableSettings settings = Load(settingsRecord);
    Frame f;
    if constexpr (Multi) f.Output2D<T>(*y);
    f.Output<Time>(times);
    f.Result(last);
    const Handle table = settings.table;
    const Shape xd = Multi ? Dims(x) : Shape{1, Count(x)};
    const int32_t m = Count(times);
    Status s = TableChecks(table, settings.oversample);
    const double* cells = nullptr;
    const T* xs = nullptr;
    Time* ts = nullptr;
    if (s == 0) s = f.In(table, &cells);
    if (s == 0) s = Multi ? f.In2D(x, &xs) : f.In(x, &xs);
    if (s == 0) s = f.InPlace(times, &ts);
    const size_t rows = static_cast<size_t>(xd.rows), count = static_cast<size_t>(m);
    Scratch<double> instants;
    Scratch<T> out;
    if (s == 0) s = instants.Allocate(count);
    if (s == 0) s = out.Allocate(rows * count);
    VariableResult r{};
    if (s == 0) {
        for (size_t j = 0; j < count; ++j) instants[j] = std::real(ts[j]);
        const Table t = TableOf(cells, Count(table), settings.oversample, settings.interpolation);
        s = ResampleVariableBlock(t, settings.antiAlias != 0, xs, xd.rows, xd.cols, instants.get(), m, *last,
                                  out.get(), &r);
    }
    T* ys = nullptr;
    if constexpr (Multi) {
        if (s == 0) s = f.Resize2D(*y, xd.rows, r.done, &ys) == 0 ? 0 : OutOfMemoryErr;
        for (size_t row = 0; s == 0 && row < rows; ++row)
            std::copy_n(out.get() + row * count, r.done, ys + row * static_cast<size_t>(r.done));
    } else {
        for (int32_t j = 0; s == 0 && j < r.done; ++j) ts[j] = out[static_cast<size_t>(j)];
    }
    for (int32_t j = r.done; s == 0 && j < m; ++j) ts[j] -= r.consumed;
    s = MergeRelease(s, out.Release());
    s = f.Finish(MergeRelease(s, instants.Release()));
    if (s < 0) r = {0, 0, kNaN};
    *last = s < 0 ? kNaN : r.last - r.consumed;
    *done = r.done;
    *consumed = r.consumed;
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

TW_API int32_t Resample_Const(Array1DHandle x, ResampleState* state, const ResampleSettings* settings,
                              int32_t reset, Array1DHandle y, int32_t* produced, int32_t antiAlias) {
    return ResampleConst<double>(x, state, settings, reset, y, produced, antiAlias);
}

TW_API int32_t CxResample_Const(Array1DHandle x, ResampleState* state, const ResampleSettings* settings,
                                int32_t reset, Array1DHandle y, int32_t* produced, int32_t antiAlias) {
    return ResampleConst<cdouble>(x, state, settings, reset, y, produced, antiAlias);
}

TW_API int32_t Resample_Variable(Array1DHandle x, Array1DHandle times, const VariableSettings* settings,
                                 double* lastTime, int32_t* done, int32_t* consumed) {
    return ResampleVariable<double, false>(x, nullptr, times, settings, lastTime, done, consumed);
}

TW_API int32_t CxResample_Variable(Array1DHandle x, Array1DHandle times, const VariableSettings* settings,
                                   double* lastTime, int32_t* done, int32_t* consumed) {
    return ResampleVariable<cdouble, false>(x, nullptr, times, settings, lastTime, done, consumed);
}

TW_API int32_t Resample_Variable_MultiCh(Array2DHandle x, Array2DHandle y, Array1DHandle times,
                                         const VariableSettings* settings, double* lastTime, int32_t* done,
                                         int32_t* consumed) {
    return ResampleVariable<double, true>(x, &y, times, settings, lastTime, done, consumed);
}

TW_API int32_t CxResample_Variable_MultiCh(Array2DHandle x, Array2DHandle y, Array1DHandle times,
                                           const VariableSettings* settings, double* lastTime, int32_t* done,
                                           int32_t* consumed) {
    return ResampleVariable<cdouble, true>(x, &y, times, settings, lastTime, done, consumed);
}
