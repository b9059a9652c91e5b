#include <algorithm>
#include <cmath>
#include <cstring>
#include <type_traits>

#include "filter/equiripple.hpp"
#include "filter/fir_design.hpp"
#include "filter/fir_filter.hpp"
#include "filter/multirate.hpp"
#include "frame/frame.hpp"
#include "frame/status_styles.hpp"
#include "twanlys/filter.h"

using namespace tw;

namespace {

template <class T>
Status ResizeOut(Frame& f, Handle& h, int32_t n, T** data) {
    return f.Resize(h, n, data) == 0 ? 0 : OutOfMemoryErr;
}

Status DesignTruncatedSinc(double fs, double fl, double fh, int32_t taps, Handle& h, int32_t type) {
    Frame f;
    f.Output<double>(h);
    double* out = nullptr;
    Status s = taps < 1 ? OrderNotPositiveErr : ResizeOut(f, h, taps, &out);
    if (s == 0) s = TruncatedSincDesign(fs, fl, fh, taps, type, out);
    return f.Finish(s);
}

Status DesignEquiripple(int32_t taps, double fs, Handle bands, int32_t kind, Handle& h, double* deviation,
                        int32_t limit) {
    Frame f;
    f.Output<double>(h);
    const int32_t nb = std::max(Count(bands), 0);
    const EquirippleBand* b = nullptr;
    Status s = f.In(bands, &b);
    bool finite = std::isfinite(fs);
    for (int32_t i = 0; s == 0 && i < nb; ++i)
        finite = finite && std::isfinite(b[i].gain) && std::isfinite(b[i].lower) && std::isfinite(b[i].upper) &&
                 std::isfinite(b[i].weight);
    double* out = nullptr;
    if (s == 0) s = !finite ? DesignParameterErr : taps < 1 ? OrderNotPositiveErr : nb < 1 ? CutoffInvalidErr : 0;
    if (s == 0) s = ResizeOut(f, h, taps, &out);
    double dev = kNaN;
    bool ranOut = false;
    if (s == 0) s = EquirippleDesign(taps, fs, b, nb, kind, limit, out, &dev, &ranOut);
    s = f.Finish(s);
    if (deviation != nullptr) *deviation = (s >= 0 || ranOut) ? dev : kNaN;
    return s;
}

Status DesignNarrowband(double fs, double f1, double f2, double centre, double ripple, double attenuation,
                        int32_t type, NarrowFilterSpec* spec) {
    Handle model = spec->model, image = spec->image;
    Frame f;
    f.Output<double>(model);
    f.Output<double>(image);
    NarrowbandStages st;
    Status s = NarrowbandDesign(fs, f1, f2, centre, ripple, attenuation, type, &st);
    double* out = nullptr;
    if (s == 0) s = ResizeOut(f, model, st.nModel, &out);
    if (s == 0) std::copy(st.model, st.model + st.nModel, out);
    if (s == 0) s = ResizeOut(f, image, st.nImage, &out);
    if (s == 0 && st.nImage > 0) std::copy(st.image, st.image + st.nImage, out);
    s = MergeRelease(s, ScratchFree(st.model));
    s = MergeRelease(s, ScratchFree(st.image));
    s = f.Finish(s);
    spec->model = model;
    spec->image = image;
    if (s < 0) {
        spec->interpolation = 0;
    } else {
        spec->filterClass = st.filterClass;
        spec->interpolation = st.interpolation;
    }
    return s;
}

template <class T>
Status RunNarrowband(Handle x, const NarrowFilterSpec* spec, Handle& y) {
    Frame f;
    f.Output<T>(y);
    if (spec == nullptr) return f.Finish(EmptyArrayErr);
    const int32_t n = Count(x);
    const NarrowbandTaps taps{spec->filterClass, spec->interpolation, nullptr, Count(spec->model), nullptr,
                              Count(spec->image)};
    Status s = n < 1 ? EmptyArrayErr : 0;
    // A spec that no design filled (or a failed one) has no taps to run.
    if (s == 0 && (taps.L < 1 || taps.nModel < 1 || (taps.L > 1 && taps.nImage < 1))) s = EmptyArrayErr;
    NarrowbandTaps t = taps;
    const T* xs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = f.In(spec->model, &t.model);
    if (s == 0 && t.L > 1) s = f.In(spec->image, &t.image);
    const int64_t ny = s == 0 ? NarrowbandLength(t, n) : 0;
    if (s == 0 && ny > INT32_MAX) s = OutOfMemoryErr;
    T* out = nullptr;
    if (s == 0) s = ResizeOut(f, y, static_cast<int32_t>(ny), &out);
    if (s == 0) {
        if constexpr (std::is_same_v<T, double>)
            s = NarrowbandFilter(t, xs, n, out);
        else
            s = CxNarrowbandFilter(t, xs, n, out);
    }
    return f.Finish(s);
}

// The streaming engine behind the four ppMultiRateFIRH members.
template <class T, class R>
Status MultiRate(Handle x, Handle& y, Handle& state, int32_t mode, int32_t L, int32_t M, Handle h, R gain,
                 const uint8_t* reset, const uint8_t* compensate, int32_t* delay, int32_t* phase) {
    Frame f;
    f.Output<T>(y);
    f.Output<T>(state);
    const int32_t n = Count(x), taps = Count(h);
    const bool init = *reset != 0 || Count(state) == 0;
    const Status warning = n < 1 ? EmptyInputWarn : 0;
    Status s = taps - 1 < 0 ? OrderNotPositiveErr
               : L < 1 || M < 1 ? BadDataRangeErr
               : mode < 0 || mode > 3 ? InvalidSelectorErr
               : !init && *delay < 0 ? NegativeArgumentErr
                                     : 0;
    int32_t d = *delay, ph = *phase;
    if (s == 0 && init) {
        if (*compensate == 0) {
            d = ph = 0;
        } else if ((taps - 1) % 2 != 0) {
            s = EvenTapsErr;
        } else if (mode < 2) {
            d = (taps - 1) / 2;
            ph = 0;
        } else {
            d = static_cast<int32_t>(std::floor(((taps - 1) * 0.5) / M));
            ph = ((taps - 1) / 2) % M;
        }
    }
    const int64_t cells = s == 0 ? MultiRateStateLength(mode, taps, L, M) : 0;
    T* st = nullptr;
    if (s == 0 && cells > INT32_MAX) s = OutOfMemoryErr;
    if (s == 0 && init) {
        s = ResizeOut(f, state, static_cast<int32_t>(cells), &st);
        if (s == 0) std::fill(st, st + cells, T{});
        if (mode >= 2) ph = (M - ph % M) % M;
    } else if (s == 0) {
        s = Count(state) != cells ? StateSizeErr : f.InPlace(state, &st);
    }
    if (s == 0 && mode >= 2) ph = (ph % M + M) % M;
    const int64_t ny = s == 0 ? MultiRateOutputs(mode, n, L, M, d, ph) : 0;
    if (s == 0 && ny > INT32_MAX) s = OutOfMemoryErr;
    T* out = nullptr;
    if (s == 0) s = ResizeOut(f, y, static_cast<int32_t>(ny), &out);
    const T* xs = nullptr;
    const R* hs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = f.In(h, &hs);
    if (s == 0) s = MultiRateFir<T, R>(mode, xs, n, hs, taps, L, M, gain, st, &d, &ph, out);
    s = f.Finish(s == 0 ? warning : s);
    if (s < 0) d = ph = 0;
    *delay = d;
    *phase = mode >= 2 ? ph : (M > 0 ? ph % M : ph);
    return s;
}

// The single-purpose f64 streams: an empty x gives an empty y and success; the host's own
// status is handed on when a resize fails; a state of the wrong length is a RateStateSizeErr.
enum class Stream { Interpolator, Decimator, Interpolated };

Status SinglePurpose(Stream kind, Handle x, Handle& y, double gain, int32_t factor, Handle h, Handle& state,
                     uint8_t reset, int32_t startPhase, int32_t* delay) {
    Frame f;
    f.Output<double>(y);
    // The state is worked in place: a failure empties it with y, also that of an empty block.
    f.Output<double>(state);
    const int32_t n = Count(x), taps = Count(h);
    double* out = nullptr;
    if (n < 1) return f.Finish(f.Resize(y, 0, &out));
    Status s = taps < 1 ? OrderNotPositiveErr : factor < 1 ? BadDataRangeErr : *delay < 0 ? NegativeArgumentErr : 0;
    const int64_t cells = s != 0                      ? 0
                          : kind == Stream::Interpolator ? MultiRateStateLength(kInterpolate, taps, factor, 1)
                          : kind == Stream::Decimator  ? MultiRateStateLength(kDecimate, taps, 1, factor)
                                                       : int64_t{taps - 1} * factor;
    if (s == 0 && cells > INT32_MAX) s = OutOfMemoryErr;
    double* st = nullptr;
    if (s == 0 && reset != 0) {
        s = f.Resize(state, static_cast<int32_t>(cells), &st);
        if (s == 0) std::fill(st, st + cells, 0.0);
        if (s == 0 && kind == Stream::Decimator) st[cells - 1] = (factor - (startPhase % factor + factor) % factor) % factor;
    } else if (s == 0) {
        s = Count(state) != cells ? RateStateSizeErr : f.InPlace(state, &st);
    }
    int32_t d = *delay, counter = 0;
    if (s == 0 && kind == Stream::Decimator) {
        const double c = st[cells - 1];
        counter = std::isfinite(c) && std::fabs(c) < 2147483647.0 ? static_cast<int32_t>(c) % factor : 0;
        if (counter < 0) counter += factor;
    }
    const int64_t ny = s != 0                      ? 0
                       : kind == Stream::Interpolator ? MultiRateOutputs(kInterpolate, n, factor, 1, d, 0)
                       : kind == Stream::Decimator  ? MultiRateOutputs(kDecimate, n, 1, factor, d, counter)
                                                    : std::max<int64_t>(0, int64_t{n} - d);
    if (s == 0 && ny > INT32_MAX) s = OutOfMemoryErr;
    if (s == 0) s = f.Resize(y, static_cast<int32_t>(ny), &out);
    const double *xs = nullptr, *hs = nullptr;
    if (s == 0) s = f.In(x, &xs);
    if (s == 0) s = f.In(h, &hs);
    if (s == 0) {
        switch (kind) {
        case Stream::Interpolator:
            s = MultiRateFir<double, double>(kInterpolate, xs, n, hs, taps, factor, 1, gain, st, &d, &counter, out);
            break;
        case Stream::Decimator:
            s = MultiRateFir<double, double>(kDecimate, xs, n, hs, taps, 1, factor, gain, st, &d, &counter, out);
            st[cells - 1] = counter;
            break;
        case Stream::Interpolated: s = StretchedFir(xs, n, hs, taps, factor, gain, st, &d, out); break;
        }
    }
    s = f.Finish(s);
    *delay = s < 0 ? 0 : d;
    return s;
}

}  // namespace

TW_API int32_t FIRCoefs(double* fs, double* fl, double* fh, int32_t* taps, Array1DHandle h, int32_t* type,
                        int32_t* status) {
    *type = std::clamp(*type, 0, 3);
    return ToPointer(status, DesignTruncatedSinc(*fs, *fl, *fh, *taps, h, *type));
}

TW_API int32_t Parks(int32_t* taps, double* fs, Array1DHandle bands, int32_t* kind, Array1DHandle h,
                     double* deviation, int32_t* limit, int32_t* status) {
    const Status s = DesignEquiripple(*taps, *fs, bands, *kind, h, deviation, *limit);
    ToPointer(status, s);
    return s == OutOfMemoryErr ? 2 : 0;
}

TW_API int32_t FIRNarrowCoef_head(double* fs, double* firstEdge, double* secondEdge, double* centre,
                                  double* ripple, double* attenuation, int32_t* type, NarrowFilterSpec* spec,
                                  int32_t* status) {
    if (spec == nullptr) return ToPointer(status, DesignParameterErr);
    return ToPointer(status, DesignNarrowband(*fs, *firstEdge, *secondEdge, *centre, *ripple, *attenuation, *type,
                                              spec));
}

TW_API int32_t FIRnarrowFilter_head(Array1DHandle x, NarrowFilterSpec* spec, Array1DHandle y, int32_t* status) {
    return ToPointer(status, RunNarrowband<double>(x, spec, y));
}

TW_API int32_t CxSigFIRnarrowFilter_head(Array1DHandle x, NarrowFilterSpec* spec, Array1DHandle y,
                                         int32_t* status) {
    return ToPointer(status, RunNarrowband<cdouble>(x, spec, y));
}

TW_API int32_t ppMultiRateFIRH_DBL(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t mode, int32_t L,
                                   int32_t M, Array1DHandle h, double gain, uint8_t* reset, uint8_t* compensate,
                                   int32_t* delay, int32_t* phase) {
    return MultiRate<double, double>(x, y, state, mode, L, M, h, gain, reset, compensate, delay, phase);
}

TW_API int32_t ppMultiRateFIRH_SGL(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t mode, int32_t L,
                                   int32_t M, Array1DHandle h, float gain, uint8_t* reset, uint8_t* compensate,
                                   int32_t* delay, int32_t* phase) {
    return MultiRate<float, float>(x, y, state, mode, L, M, h, gain, reset, compensate, delay, phase);
}

TW_API int32_t ppMultiRateFIRH_CDB(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t mode, int32_t L,
                                   int32_t M, Array1DHandle h, double gain, uint8_t* reset, uint8_t* compensate,
                                   int32_t* delay, int32_t* phase) {
    return MultiRate<cdouble, double>(x, y, state, mode, L, M, h, gain, reset, compensate, delay, phase);
}

TW_API int32_t ppMultiRateFIRH_CSG(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t mode, int32_t L,
                                   int32_t M, Array1DHandle h, float gain, uint8_t* reset, uint8_t* compensate,
                                   int32_t* delay, int32_t* phase) {
    return MultiRate<cfloat, float>(x, y, state, mode, L, M, h, gain, reset, compensate, delay, phase);
}

TW_API int32_t InterpolatorFIRH(Array1DHandle x, Array1DHandle y, double gain, int32_t L, Array1DHandle h,
                                Array1DHandle state, uint8_t reset, int32_t* delay) {
    return SinglePurpose(Stream::Interpolator, x, y, gain, L, h, state, reset, 0, delay);
}

TW_API int32_t DecimatorFIRH(Array1DHandle x, Array1DHandle y, double gain, int32_t M, Array1DHandle h,
                             Array1DHandle state, uint8_t reset, int32_t startPhase, int32_t* delay) {
    return SinglePurpose(Stream::Decimator, x, y, gain, M, h, state, reset, startPhase, delay);
}

TW_API int32_t InterpolatedFIRH(Array1DHandle x, Array1DHandle y, int32_t L, double gain, Array1DHandle h,
                                Array1DHandle state, uint8_t reset, int32_t* delay) {
    return SinglePurpose(Stream::Interpolated, x, y, gain, L, h, state, reset, 0, delay);
}
