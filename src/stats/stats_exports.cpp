#include <cstring>

#include "frame/frame.hpp"
#include "stats/descriptive.hpp"
#include "twanlys/stats.h"

using namespace tw;

namespace {

// The frame of the one-array reductions: empty test, aligned view, core, failure contract.
template <class T, class Core>
Status Reduce(Handle x, double* result, Core core) {
    Frame f;
    f.Result(result);
    const int32_t n = Count(x);
    const T* xs = nullptr;
    Status s = n < 1 ? EmptyArrayErr : f.In(x, &xs);
    if (s == 0) s = core(xs, n);
    return f.Finish(s);
}

}  // namespace

TW_API int32_t Mean_head(Array1DHandle x, double* mean, int32_t* status) {
    return ToPointer(status, Reduce<double>(x, mean, [&](auto* xs, int32_t n) { return Mean(xs, n, mean); }));
}

TW_API int32_t RMS_head(Array1DHandle x, double* rms, int32_t* status) {
    return ToPointer(status, Reduce<double>(x, rms, [&](auto* xs, int32_t n) { return Rms(xs, n, rms); }));
}

TW_API int32_t CxRMS_head(Array1DHandle x, double* rms) {
    return Reduce<cdouble>(x, rms, [&](auto* xs, int32_t n) { return CxRms(xs, n, rms); });
}

TW_API int32_t Median_head(Array1DHandle x, double* median, int32_t* status) {
    return ToPointer(status,
                     Reduce<double>(x, median, [&](auto* xs, int32_t n) { return Median(xs, n, median); }));
}

TW_API int32_t Moment_head(Array1DHandle x, int32_t* order, double* moment, int32_t* status) {
    return ToPointer(status, Reduce<double>(x, moment, [&](auto* xs, int32_t n) {
                         return CentralMoment(xs, n, *order, moment);
                     }));
}

TW_API int32_t MSE_head(Array1DHandle x, Array1DHandle y, double* mse, int32_t* status) {
    Frame f;
    f.Result(mse);
    const int32_t nx = Count(x), ny = Count(y);
    const double *xs = nullptr, *ys = nullptr;
    Status s = (nx < 1 || ny < 1) ? EmptyArrayErr : f.In(x, &xs);
    if (s == 0) s = f.In(y, &ys);
    if (s == 0) s = MeanSquaredError(xs, nx, ys, ny, mse);
    return ToPointer(status, f.Finish(s));
}

TW_API int32_t ModeH(Array1DHandle x, int32_t intervals, Array1DHandle modes) {
    Frame f;
    f.Output<double>(modes);
    const int32_t n = Count(x);
    const double* xs = nullptr;
    Status s = n < 1 ? EmptyArrayErr : f.In(x, &xs);
    Scratch<double> found;
    int32_t count = 0;
    if (s == 0) s = found.Allocate(static_cast<size_t>(ModeCapacity(n, intervals)));
    if (s == 0) s = Mode(xs, n, intervals, found.get(), &count);
    double* out = nullptr;
    if (s == 0) s = f.Resize(modes, count, &out);
    if (s == 0 && count > 0) std::memcpy(out, found.get(), static_cast<size_t>(count) * sizeof(double));
    return f.Finish(MergeRelease(s, found.Release()));
}

TW_API int32_t histgran_head(Array1DHandle x, int32_t* bins, Array1DHandle counts,
                             Array1DHandle centres, int32_t* status) {
    Frame f;
    f.Output<int32_t>(counts);
    f.Output<double>(centres);
    const int32_t n = Count(x), m = *bins;
    const double* xs = nullptr;
    int32_t* c = nullptr;
    double* centre = nullptr;
    Status s = (n < 1 || m < 1) ? EmptyArrayErr : f.In(x, &xs);
    if (s == 0 && (f.Resize(counts, m, &c) != 0 || f.Resize(centres, m, &centre) != 0))
        s = OutOfMemoryErr;
    if (s == 0) s = DataHistogram(xs, n, m, c, centre);
    return ToPointer(status, f.Finish(s));
}

TW_API int32_t GenHistH(Array1DHandle x, Array1DHandle intervals, Array1DHandle counts,
                        HistogramOutside* outside, int32_t* status) {
    Frame f;
    f.Output<int32_t>(counts);
    const int32_t n = Count(x), m = Count(intervals);
    const double* xs = nullptr;
    int32_t* c = nullptr;
    Scratch<Interval> copy;
    Status s = m < 0 ? SizeMismatchErr : n < 1 ? EmptyArrayErr : f.In(x, &xs);
    if (s == 0 && copy.Allocate(static_cast<size_t>(m)) != 0) s = OutOfMemoryErr;
    if (s == 0 && f.Resize(counts, m, &c) != 0) s = OutOfMemoryErr;
    OutsideCounts out{0, 0, 0};
    if (s == 0) {
        const auto* records = static_cast<const unsigned char*>(*intervals) + 4;
        for (int32_t i = 0; i < m; ++i) {
            const unsigned char* r = records + static_cast<size_t>(i) * sizeof(HistogramInterval);
            std::memcpy(&copy[i].low, r, 8);
            std::memcpy(&copy[i].high, r + 8, 8);
            std::memcpy(&copy[i].type, r + 16, 4);
        }
        GeneralHistogram(xs, n, copy.get(), m, c, &out);
    }
    s = f.Finish(MergeRelease(s, copy.Release()));
    if (outside != nullptr) {
        const HistogramOutside record = s < 0 ? HistogramOutside{0, 0, 0}
                                              : HistogramOutside{out.total, out.below, out.above};
        std::memcpy(outside, &record, sizeof record);
    }
    return ToPointer(status, s);
}
