/* Waveform measurements: state levels, pulses, transitions and cycles. Times are t0 + index dt.
 * Every negative status sets all f64 results to 0. */
#ifndef TWANLYS_MEASURE_H
#define TWANLYS_MEASURE_H

#include "twanlys/types.h"

/* Reference levels of a pulse or transition measurement; units non-zero: percent of the amplitude
 * between the state levels, from the low state. */
#pragma pack(push, 1)
typedef struct {
    double high;
    double mid;
    double low;
    uint16_t units;
} MeasureReferences;
#pragma pack(pop)

/* How state levels are found: method 0 histogram, 1 extreme values, 2 histogram falling back to
 * extreme values; bins of the histogram. */
typedef struct {
    uint32_t method;
    int32_t bins;
} HistogramSettings;

/* State levels of x. The bin buffer is kept in the work cell (freed by a host cleanup) or, for
 * the _IDP twin, in the instance-data cell (freed by MeasurementUnreserveProc). strict (0 or 1)
 * makes method 2 take histogram levels only when both are well populated. A weakly populated
 * histogram under method 0 gives StateLevelWeakWarn with the levels in place. */
TW_API int32_t StateLevels(Array1DHandle x, double t0, double dt, int32_t method, int32_t bins, void** cell,
                           double* high, double* low, double* amplitude, int32_t strict);
TW_API int32_t StateLevels_IDP(Array1DHandle x, double t0, double dt, int32_t method, int32_t bins,
                               void** cell, double* high, double* low, double* amplitude, int32_t strict);

/* Pulse number `number` (from 1) found on crossings of the mid reference with hysteresis.
 * polarity 0xFFFF: the pulse between crossings 2N-2 and 2N-1; 1: the N-th pulse starting with a
 * rising crossing; 0: with a falling one. unbounded: the pulse needs no following crossing, and
 * period and duty are 0. The low, mid and high outputs are the references in absolute units. */
TW_API int32_t PulseMeasEx(Array1DHandle x, double t0, double dt, uint16_t polarity, uint16_t unbounded,
                           int32_t number, const MeasureReferences* references,
                           const HistogramSettings* histogram, void** cell, double* period, double* width,
                           double* duty, double* centre, double* low, double* mid, double* high, int32_t strict);
TW_API int32_t PulseMeas(Array1DHandle x, double t0, double dt, uint16_t polarity, int32_t number,
                         const MeasureReferences* references, const HistogramSettings* histogram, void** cell,
                         double* period, double* width, double* duty, double* centre, double* low,
                         double* mid, double* high, int32_t strict);
TW_API int32_t PulseMeasEx_IDP(Array1DHandle x, double t0, double dt, uint16_t polarity, uint16_t unbounded,
                               int32_t number, const MeasureReferences* references,
                               const HistogramSettings* histogram, void** cell, double* period, double* width,
                               double* duty, double* centre, double* low, double* mid, double* high,
                               int32_t strict);

/* Transition number `number` of the direction `polarity` (1 rising, 0 falling, 0xFFFF either),
 * from the last crossing of the reference it leaves to the first crossing of the other.
 * Preshoot and overshoot are in percent of the amplitude between the state levels, signed, 0
 * (with time 0) unless the extreme lies outside the state's histogram bin. */
TW_API int32_t TransMeas(Array1DHandle x, double t0, double dt, uint16_t polarity, int32_t number,
                         const MeasureReferences* references, const HistogramSettings* histogram, void** cell,
                         double* slewRate, double* duration, double* startTime, double* endTime,
                         double* preshoot, double* preshootTime, double* overshoot, double* overshootTime,
                         double* low, double* mid, double* high, int32_t strict);
TW_API int32_t TransMeas_IDP(Array1DHandle x, double t0, double dt, uint16_t polarity, int32_t number,
                             const MeasureReferences* references, const HistogramSettings* histogram,
                             void** cell, double* slewRate, double* duration, double* startTime,
                             double* endTime, double* preshoot, double* preshootTime, double* overshoot,
                             double* overshootTime, double* low, double* mid, double* high, int32_t strict);

/* RMS and mean of x over cycle `number`: from the start of pulse 2N-2..2N-1 over one period. */
TW_API int32_t CycleRMSAverage(Array1DHandle x, double t0, double dt, int32_t number,
                               const MeasureReferences* references, const HistogramSettings* histogram,
                               void** cell, double* rms, double* mean, double* low, double* mid, double* high,
                               int32_t strict);
TW_API int32_t CycleRMSAverage_IDP(Array1DHandle x, double t0, double dt, int32_t number,
                                   const MeasureReferences* references, const HistogramSettings* histogram,
                                   void** cell, double* rms, double* mean, double* low, double* mid,
                                   double* high, int32_t strict);

/* Runs of at least *width samples at or above *threshold: the index of each run's first sample.
 * The status is stored through `status` and returned. */
TW_API int32_t PeakDetector(Array1DHandle x, double* threshold, int32_t* width, Array1DHandle locations,
                            int32_t* count, int32_t* status);

/* Settings of the streaming detector. flags bit 0: first block of a stream, bit 2: last block. */
typedef struct {
    Array1DHandle data;
    double threshold;
    int32_t width;
    int32_t polarity; /* 0 peaks, 1 valleys */
    Array1DHandle locations;
    Array1DHandle amplitudes;
    Array1DHandle secondDerivatives;
    int32_t count;
    uint32_t flags;
} PeakDetectSettings;

/* What a stream carries between blocks (64 bytes); the pointers point into the work buffer and
 * are rebound on every call. Cleared after the last block or a failure. */
typedef struct {
    int32_t width;
    int32_t windowsDone;
    int32_t tailCount;
    int32_t carried;
    int32_t lastSign;
    int32_t polarity;
    double* projection;
    double* window;
    double* tail;
    double* lastCoefficients;
    const double* data;
} PeakDetectState;

/* Streaming peak or valley detection by quadratic fits over windows of `width` samples, with the
 * window's tail carried in the work buffer (f64, 5 width + 3 elements). Locations are indices in
 * the stream, fractional; amplitudes and second derivatives come from the fits. mode 2 reads raw
 * instead of the settings' data; any non-zero mode fits near-constant data on the mean-removed,
 * normalised windows. The status is stored through `status` and returned. */
TW_API int32_t PeakD2014(Array1DHandle raw, PeakDetectSettings* settings, PeakDetectState* state,
                         Array1DHandle work, int32_t* status, int32_t mode);
TW_API int32_t PeakD2010(PeakDetectSettings* settings, PeakDetectState* state, Array1DHandle work,
                         int32_t* status, int32_t mode);
TW_API int32_t PeakD(PeakDetectSettings* settings, PeakDetectState* state, Array1DHandle work, int32_t* status);

/* The measurements hold no state: these return 0 and do nothing. */
TW_API int32_t measurements_create(void);
TW_API int32_t measurements_clear(void);
TW_API int32_t measurements_destroy(void);

/* One measurement of the n samples by selector, into result[0] (and result[2] for the time of
 * 28, 29; result[0..7] for the transition records 32, 33). 0-2: minimum, maximum, their difference;
 * 3-5: histogram low, high, amplitude; 6-8: automatic high, low, amplitude; 9-11: low, mid, high
 * reference in absolute units; 12: hysteresis; 13: RMS; 14: mean; 15: period; 16: 1 / period;
 * 17, 18: RMS and mean of the first cycle; 19, 20: duration of the first rising, falling
 * transition; 21: 2-norm; 22, 23: width of the first positive, negative pulse; 24, 25: their duty
 * cycles; 26, 27: slew rate of the first rising, falling transition; 28, 29: preshoot and
 * overshoot of the first transition of `polarity` with its time; 30, 31: pulse centres; 32, 33:
 * slew rate, duration, start, end, preshoot, its time, overshoot, its time of the first rising,
 * falling transition. Other selectors leave the result alone. */
TW_API int32_t measurements_fetch(void* unused, int32_t selector, const MeasureReferences* references,
                                  const HistogramSettings* histogram, int32_t polarity, double t0, double dt,
                                  const double* samples, int32_t n, int32_t strict, double* result);

/* Sine tones of the first n samples of x: frequency (1 / dt units), amplitude and phase in
 * degrees of A sin(2 pi f t + phase), refined below the bin width on the Hann-windowed spectrum
 * with the other tones' leakage removed. sort 1 orders by amplitude (largest first), otherwise by
 * frequency. Tones below threshold are dropped; at most maxTones are sought (0: return at once).
 * residualMode 0 none, 1 x, 2 the sum of the tones, 3 x minus that sum; spectrum is then the
 * residual's windowed power spectrum in dB over (n + 1) / 2 bins from f0 = 0 in steps df. */
TW_API int32_t MultipleToneMeasurements(Array1DHandle x, int32_t n, double dt, int32_t sort, int32_t residualMode,
                                        double threshold, int32_t maxTones, int32_t* found, Array1DHandle frequencies,
                                        Array1DHandle amplitudes, Array1DHandle phases, Array1DHandle residual,
                                        double* dtOut, Array1DHandle spectrum, double* f0, double* df);

#endif
