#include "signal/triggers.hpp"

#include <cmath>

namespace tw {

namespace {

struct Channel {
    double level;
    double h;
    bool rising;

    bool Arms(double v) const { return rising ? v < level - h : v > level + h; }
    bool Fires(double v) const { return rising ? v >= level : v <= level; }
};

Channel ChannelOf(const TriggerSettings& t, int32_t c) {
    const double level = c < t.nLevel ? t.level[c] : 0.0;
    const double hysteresis = c < t.nHysteresis ? t.hysteresis[c] : 0.0;
    const int32_t slope = c < t.nSlope ? t.slope[c] : 1;
    return {level, std::fabs(hysteresis), slope != 0};
}

// Scans one row until it holds `maximum` triggers; record(j) takes each trigger index. Returns
// the armed state at the end.
template <class Record>
bool Scan(const double* row, int32_t cols, const Channel& ch, bool armed, int32_t maximum, int32_t* count,
          Record record) {
    *count = 0;
    for (int32_t j = 0; j < cols && *count < maximum; ++j) {
        const double v = row[j];
        if (!armed) {
            armed = ch.Arms(v);
        } else if (ch.Fires(v)) {
            record(j);
            ++*count;
            armed = false;
        }
    }
    return armed;
}

}  // namespace

void TriggerChannels(const double* x, int32_t rows, int32_t cols, const TriggerSettings& t, int32_t* armed,
                     int32_t maximum, int32_t* indices, int32_t* counts, int32_t* found) {
    const int32_t width = maximum > 0 ? maximum : 0;
    for (int32_t c = 0; c < rows; ++c) {
        int32_t* out = indices + static_cast<int64_t>(c) * width;
        for (int32_t k = 0; k < width; ++k) out[k] = 0;
        int32_t count = 0;
        const bool on = Scan(x + static_cast<int64_t>(c) * cols, cols, ChannelOf(t, c), armed[c] != 0,
                             maximum, &count, [&](int32_t j) { out[count] = j; });
        armed[c] = on ? 1 : 0;
        counts[c] = count;
        found[c] = count != 0 ? 1 : 0;
    }
}

void TriggerChannelsPacked(const double* x, int32_t rows, int32_t cols, const TriggerSettings& t,
                           const double* previous, int32_t nPrevious, int32_t maximum, int32_t* indices,
                           int32_t nIndices, int32_t* counts, int32_t* found, double* last) {
    constexpr int32_t kStored = 50;
    int32_t position = 0;
    for (int32_t c = 0; c < rows; ++c) {
        const Channel ch = ChannelOf(t, c);
        const bool armed = c < nPrevious && ch.Arms(previous[c]);
        const double* row = x + static_cast<int64_t>(c) * cols;
        int32_t count = 0;
        Scan(row, cols, ch, armed, maximum, &count, [&](int32_t j) {
            if (position < kStored && position < nIndices) indices[position] = j;
            ++position;
        });
        if (count == 0) {
            if (position < nIndices) indices[position] = 0;
            ++position;
        }
        counts[c] = count;
        found[c] = count != 0 ? 1 : 0;
        last[c] = cols > 0 ? row[cols - 1] : 0.0;
    }
}

}  // namespace tw
