#include <algorithm>
#include <cstring>

#include "frame/frame.hpp"
#include "frame/status_styles.hpp"
#include "signal/decimate.hpp"
#include "signal/moving_average.hpp"
#include "twanlys/signal.h"

using namespace tw;

namespace {

// Resize failures of the decimators are reported as OutOfMemoryErr.
template <class T>
Status ResizeOut(Frame& f, Handle& h, int32_t n, T** data) {
    return f.Resize(h, n, data) == 0 ? 0 : OutOfMemoryErr;
}

// A caller's complex scalar, read and written without assuming its alignment.
template <class T>
T Load(const void* p) {
    T v;
    std::memcpy(&v, p, sizeof v);
    return v;
}
template <class T>
void Store(void* p, const T& v) {
    std::memcpy(p, &v, sizeof v);
}

// x replaced by its K = n / factor picks or group means. The outputs go through a scratch copy:
// the block shrinks only after every input has been read.
template <class T>
Status DecimateInPlace(Handle& x, int32_t factor, bool average) {
    Frame f;
    f.Output<T>(x);
    const int32_t n = Count(x);
    Status s = n < 1 ? EmptyArrayErr : factor < 1 || factor > n ? DecimationFactorErr : 0;
    const T* xs = nullptr;
    Scratch<T> out;
    const int32_t count = s == 0 ? n / factor : 0;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = out.Allocate(static_cast<size_t>(count));
    if (s == 0) s = DecimateBlock(xs, n, factor, average, out.get());
    T* ys = nullptr;
    if (s == 0) s = ResizeOut(f, x, count, &ys);
    if (s == 0) std::copy(out.get(), out.get() + count, ys);
    return f.Finish(MergeRelease(s, out.Release()));
}

template <class T>
Status DecimateContinuous(Handle& x, int32_t factor, int32_t average, int32_t* offset, int32_t reset,
                          int32_t* partial, void* sum) {
    Frame f;
    f.Output<T>(x);
    f.Result(static_cast<double*>(sum), static_cast<int32_t>(sizeof(T) / sizeof(double)));
    DecimateCarry<T> c{*offset, *partial, Load<T>(sum)};
    Status s = factor < 1 ? BadDataRangeErr : c.offset < 0 ? NegativeArgumentErr : 0;
    if (s == 0 && reset != 0) c.partial = 0, c.sum = T{};
    const int32_t n = Count(x);
    const T* xs = nullptr;
    Scratch<T> out;
    const int32_t count = s == 0 ? DecimateStreamCount(n, factor, average != 0, c) : 0;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = out.Allocate(static_cast<size_t>(count));
    if (s == 0) DecimateStream(xs, n, factor, average != 0, &c, out.get());
    T* ys = nullptr;
    if (s == 0) s = ResizeOut(f, x, count, &ys);
    if (s == 0) {
        std::copy(out.get(), out.get() + count, ys);
        *offset = c.offset;
        *partial = c.partial;
        Store(sum, c.sum);
    }
    return f.Finish(MergeRelease(s, out.Release()));
}

template <class T>
void DecimatedMovingSumInPlace(Handle& x, int32_t factor, void* sum, int32_t* count, int32_t reset,
                               int32_t* produced) {
    if (reset != 0) Store(sum, T{}), *count = 0;
    const int32_t n = Count(x);
    if (factor < 2 || n < 1) {
        *produced = std::max(n, 0);
        return;
    }
    Frame f;
    T* xs = nullptr;
    T s = Load<T>(sum);
    int32_t c = *count;
    if (f.InPlace(x, &xs) == 0) *produced = DecimatedMovingSum(xs, n, factor, &s, &c);
    if (f.Finish(0) == 0) Store(sum, s), *count = c;
}

template <class T>
Status CascadedMovingAverage(Handle& x, int32_t stages, int32_t width, Handle& sums, Handle& window,
                             int32_t* position, int32_t reset) {
    if (width < 1 || stages < 1 || (width < 2 && reset == 0)) return 0;
    Frame f;
    f.Output<T>(x);
    f.Output<T>(sums);
    f.Output2D<T>(window);
    const Shape d = Dims(window);
    const bool fresh = reset != 0 || Count(sums) != stages || d.rows != stages || d.cols != width ||
                       *position < 0 || *position >= width;
    T *ss = nullptr, *ws = nullptr, *xs = nullptr;
    Status s = 0;
    if (fresh) {
        s = f.Resize(sums, stages, &ss) == 0 ? 0 : OutOfMemoryErr;
        if (s == 0) s = f.Resize2D(window, stages, width, &ws) == 0 ? 0 : OutOfMemoryErr;
        if (s == 0) {
            std::fill(ss, ss + stages, T{});
            std::fill(ws, ws + static_cast<size_t>(stages) * static_cast<size_t>(width), T{});
        }
    } else {
        s = f.InPlace(sums, &ss);
        if (s == 0) s = f.InPlace2D(window, &ws);
    }
    if (s == 0) s = f.InPlace(x, &xs);
    const int32_t n = Count(x), start = fresh ? 0 : *position;
    if (s == 0) CascadedMovingSum(xs, n, stages, width, ss, ws, start);
    s = f.Finish(s);
    if (s == 0) *position = static_cast<int32_t>((int64_t{start} + n) % width);
    return s;
}

// The state test comes before the empty block, which leaves state and delay untouched.
Status CicFrameChecks(int32_t stages, int32_t r, int32_t d, uint8_t reset, Handle state, int32_t cells) {
    if (stages < 1 || r < 1 || d < 1) return BadDataRangeErr;
    if (cells < 0) return OutOfMemoryErr;
    if (reset == 0 && Count(state) != cells) return RateStateSizeErr;
    return 0;
}

// The state as the call works on it: zeroed on reset, otherwise taken as it stands.
Status CicState(Frame& f, Handle& state, int32_t cells, uint8_t reset, double** data) {
    if (reset == 0) return f.InPlace(state, data);
    if (const Status s = f.Resize(state, cells, data)) return s;
    std::fill(*data, *data + cells, 0.0);
    return 0;
}

}  // namespace

TW_API int32_t DecimateCIN(Array1DHandle x, int32_t* factor, uint8_t* average, int32_t* status) {
    return ToPointer(status, DecimateInPlace<double>(x, factor != nullptr ? *factor : 0,
                                                     average != nullptr && *average != 0));
}

TW_API int32_t CxDecimate_H(Array1DHandle x, int32_t factor, int32_t average) {
    return DecimateInPlace<cdouble>(x, factor, average != 0);
}

TW_API int32_t DecimateContinuous_H(Array1DHandle x, int32_t factor, int32_t average, int32_t* offset,
                                    int32_t reset, int32_t* partial, double* sum) {
    return DecimateContinuous<double>(x, factor, average, offset, reset, partial, sum);
}

TW_API int32_t CxDecimateContinuous_H(Array1DHandle x, int32_t factor, int32_t average, int32_t* offset,
                                      int32_t reset, int32_t* partial, ComplexDouble* sum) {
    return DecimateContinuous<cdouble>(x, factor, average, offset, reset, partial, sum);
}

TW_API void ReDecimatedMovingAverageH(Array1DHandle x, int32_t factor, double* sum, int32_t* count,
                                      int32_t reset, int32_t* produced) {
    DecimatedMovingSumInPlace<double>(x, factor, sum, count, reset, produced);
}

TW_API void CxDecimatedMovingAverageH(Array1DHandle x, int32_t factor, ComplexDouble* sum, int32_t* count,
                                      int32_t reset, int32_t* produced) {
    DecimatedMovingSumInPlace<cdouble>(x, factor, sum, count, reset, produced);
}

TW_API int32_t ReCascadedMovingAverageH(Array1DHandle x, int32_t stages, int32_t width, Array1DHandle sums,
                                        Array2DHandle window, int32_t* position, int32_t reset) {
    return CascadedMovingAverage<double>(x, stages, width, sums, window, position, reset);
}

TW_API int32_t CxCascadedMovingAverageH(Array1DHandle x, int32_t stages, int32_t width, Array1DHandle sums,
                                        Array2DHandle window, int32_t* position, int32_t reset) {
    return CascadedMovingAverage<cdouble>(x, stages, width, sums, window, position, reset);
}

TW_API int32_t CICDecimatorByMovH(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t stages,
                                  int32_t R, int32_t D, int32_t mode, uint8_t reset, int32_t* delay) {
    Frame f;
    f.Output<double>(y);
    f.Output<double>(state);
    const int32_t cells = stages >= 1 && R >= 1 && D >= 1 ? CicStateCells(stages, R, D, true) : 0;
    Status s = CicFrameChecks(stages, R, D, reset, state, cells);
    const int32_t n = Count(x);
    double* ys = nullptr;
    if (s == 0 && n < 1) return f.Finish(f.Resize(y, 0, &ys) != 0 ? OutOfMemoryErr : ResampleEmptyWarn);
    double* st = nullptr;
    const double* xs = nullptr;
    if (s == 0) s = CicState(f, state, cells, reset, &st);
    if (s == 0) s = f.In(x, &xs);
    CicPick pick{};
    if (s == 0) pick = CicDecimatorPick(n, R, *delay, st[cells - 1]);
    if (s == 0) s = f.Resize(y, pick.count, &ys);
    if (s == 0) s = CicDecimate(xs, n, stages, R, D, mode, pick, st, delay, ys);
    return f.Finish(s);
}

TW_API int32_t CICInterpolatorByMovH(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t stages,
                                     int32_t R, int32_t D, int32_t mode, uint8_t reset, int32_t* delay) {
    Frame f;
    f.Output<double>(y);
    f.Output<double>(state);
    const int32_t cells = stages >= 1 && R >= 1 && D >= 1 ? CicStateCells(stages, R, D, false) : 0;
    Status s = CicFrameChecks(stages, R, D, reset, state, cells);
    const int32_t n = Count(x);
    double* ys = nullptr;
    if (s == 0 && n < 1) return f.Finish(f.Resize(y, 0, &ys) != 0 ? OutOfMemoryErr : ResampleEmptyWarn);
    if (s == 0 && int64_t{n} * R > INT32_MAX) s = OutOfMemoryErr;
    double* st = nullptr;
    const double* xs = nullptr;
    if (s == 0) s = CicState(f, state, cells, reset, &st);
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = f.Resize(y, CicInterpolatorCount(n, R, *delay), &ys);
    if (s == 0) s = CicInterpolate(xs, n, stages, R, D, mode, st, delay, ys);
    return f.Finish(s);
}
