#include "measure/peaks.hpp"

#include <algorithm>
#include <cmath>

#include "matrix/solve.hpp"

namespace tw {

int32_t ThresholdRuns(const double* x, int32_t n, double threshold, int32_t width, int32_t* locations) {
    int32_t count = 0;
    for (int32_t i = 0; i < n; ++i) {
        if (!(x[i] >= threshold)) continue;
        int32_t end = i;
        while (end < n && x[end] >= threshold) ++end;
        if (end - i >= width) locations[count++] = i;
        i = end;
    }
    return count;
}

Status PeakProjection(int32_t width, double* projection) {
    if (width == 3) {
        constexpr double fixed[9] = {0, 1, 0, -0.5, 0, 0.5, 0.5, -1, 0.5};
        std::copy(fixed, fixed + 9, projection);
        return 0;
    }
    Scratch<double> v;
    if (const Status s = v.Allocate(3 * static_cast<size_t>(width))) return s;
    for (int32_t j = 0; j < width; ++j) {
        const double t = -(width - 1) / 2.0 + j;
        v[3 * static_cast<size_t>(j)] = 1;
        v[3 * static_cast<size_t>(j) + 1] = t;
        v[3 * static_cast<size_t>(j) + 2] = t * t;
    }
    const Status s = PseudoInverse<double>(v.get(), width, 3, -1, projection);
    return s < 0 ? s : 0;
}

namespace {

constexpr double kScaleFloor = 2.220446049250313e-16;

Status Append(const Peak& p, Peak** peaks, int32_t* count, int32_t* capacity) {
    if (*count == *capacity) {
        void* grown = *peaks;
        if (ScratchRealloc(&grown, (static_cast<size_t>(*capacity) + 512) * sizeof(Peak)) != 0)
            return OutOfMemoryErr;
        *peaks = static_cast<Peak*>(grown);
        *capacity += 512;
    }
    (*peaks)[(*count)++] = p;
    return 0;
}

}  // namespace

Status PeakScan(const double* projection, int32_t width, int32_t polarity, double threshold, const double* data,
                int32_t windows, bool normalise, double offset, double* window, PeakScanState* st, Peak** peaks,
                int32_t* count, int32_t* capacity) {
    const auto w = static_cast<size_t>(width);
    const double* p0 = projection;
    const double* p1 = projection + w;
    const double* p2 = projection + 2 * w;
    const double h = (width - 1) / 2.0;
    double* last = st->lastCoefficients;
    for (int32_t i = 0; i < windows; ++i) {
        const double* win = data + i;
        double scale = 1;
        if (normalise) {
            double extreme = win[0];
            for (size_t j = 1; j < w; ++j)
                extreme = polarity == 1 ? std::min(extreme, win[j]) : std::max(extreme, win[j]);
            scale = std::max(std::fabs(extreme), kScaleFloor);
            for (size_t j = 0; j < w; ++j) window[j] = win[j] / scale;
            win = window;
        }
        double c0 = 0, c1 = 0, c2 = 0;
        for (size_t j = 0; j < w; ++j) {
            c0 += p0[j] * win[j];
            c1 += p1[j] * win[j];
            c2 += p2[j] * win[j];
        }
        const int32_t sign = std::fabs(c1) <= 1e-10 ? c2 > 0 : c1 > 0;
        const bool candidate = st->windowsDone > 0 &&
                               (width < 5 ? (polarity == 0 && c2 < 0) || (polarity == 1 && c2 > 0) : sign != st->lastSign);
        double d = 2 * c2;
        if (candidate && !(std::fabs(d) < 1e-10)) {
            double x = -c1 / d;
            double y = (c2 * x + c1) * x + c0;
            double at = st->windowsDone, sc = scale;
            bool usable = true;
            if (x < -0.5) {
                // The vertex may sit better in the previous window, kept in caller units.
                const double ld = 2 * last[2];
                if (ld == 0) {
                    usable = false;
                } else {
                    const double lx = -last[1] / ld;
                    if (std::fabs(lx) < std::fabs(x)) {
                        x = lx;
                        y = (last[2] * lx + last[1]) * lx + last[0];
                        d = ld;
                        at -= 1;
                        sc = 1;
                    }
                }
            }
            if (usable && !(std::fabs(x) > 0.5 * h + 2.220446049250313e-15)) {
                const bool peak = d < 0 && polarity == 0 && y * sc > threshold - offset;
                const bool valley = d > 0 && polarity == 1 && y * sc < threshold - offset;
                if (peak || valley) {
                    const Peak found{at + h + x, y * sc + offset, d * sc};
                    Peak* prev = *count > 0 ? *peaks + (*count - 1) : nullptr;
                    if (prev != nullptr && std::fabs(found.location - prev->location) < 1.0) {
                        if (peak ? found.amplitude > prev->amplitude : found.amplitude < prev->amplitude) *prev = found;
                    } else if (const Status s = Append(found, peaks, count, capacity)) {
                        return s;
                    }
                }
            }
        }
        // The first window of a stream is stored as well: the next window may look back to it.
        last[0] = c0 * scale;
        last[1] = c1 * scale;
        last[2] = c2 * scale;
        st->lastSign = sign;
        ++st->windowsDone;
    }
    return 0;
}

}  // namespace tw
