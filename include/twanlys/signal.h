/* Signal operations: derivative, integral, phase unwrapping, triggers, pulse parameters and
 * modulators. */
#ifndef TWANLYS_SIGNAL_H
#define TWANLYS_SIGNAL_H

#include "twanlys/types.h"

/* Derivative of x in place. init holds the samples before x[0] and final those after x[n-1], so
 * that a signal cut into blocks differentiates exactly as one call. Methods: 0 second-order
 * central (one sample each side), 1 fourth-order central (two each side), 2 forward (final
 * only), 3 backward (init only). Derivative is method 0; a missing boundary sample reads as 0. */
TW_API int32_t Derivative(Array1DHandle x, Array1DHandle init, Array1DHandle final_, double* dt,
                          int32_t* status);
TW_API int32_t Derivative85(Array1DHandle x, Array1DHandle init, Array1DHandle final_, double* dt,
                            int32_t method);

/* Running integral of x in place, with boundary samples as above. Methods: 0 trapezoid, 1
 * Simpson, 2 Simpson 3/8, 3 Boole, 4 left rectangle, 5 right rectangle. Integral is method 1. */
TW_API int32_t Integral(Array1DHandle x, Array1DHandle init, Array1DHandle final_, double* dt,
                        int32_t* status);
TW_API int32_t Integral90(Array1DHandle x, Array1DHandle init, Array1DHandle final_, double dt,
                          int32_t method);
/* Running integral without boundaries: y[0] = 0, starting formulas, then the method's recursion. */
TW_API int32_t Integral_2017(Array1DHandle x, double dt, int32_t method);

/* Phase unwrapping in place. units: 0 radians, 1 radians in and degrees out, 2 degrees, 3
 * degrees in and radians out; any other value acts as 0. unWrap is units 0. */
TW_API int32_t unWrap(Array1DHandle phase, int32_t* status);
TW_API int32_t unWrap85(Array1DHandle phase, int32_t units);

/* Level triggers on the rows (channels) of x. level and hysteresis are f64 per channel, slope i32
 * per channel (1 rising, 0 falling); shorter arrays are extended with 0.0, 0.0 and 1. counts and
 * found are i32 per channel. Triggerh_86 carries the i32 armed flags through `armed` and writes
 * indices as channels x maximum (unused cells 0). Triggerh arms a channel from the previous last
 * samples, writes the last sample of each row to `last`, and packs the indices of all channels
 * into the first 50 cells of an i32 array of channels * maximum cells. */
TW_API int32_t Triggerh(Array2DHandle x, Array1DHandle level, Array1DHandle previous,
                        Array1DHandle hysteresis, Array1DHandle slope, int32_t maximum, Array1DHandle indices,
                        Array1DHandle counts, Array1DHandle found, Array1DHandle last, int32_t* status);
TW_API int32_t Triggerh_86(Array2DHandle x, Array1DHandle level, Array1DHandle armed,
                           Array1DHandle hysteresis, Array1DHandle slope, int32_t maximum,
                           Array2DHandle indices, Array1DHandle counts, Array1DHandle found);

/* Top, base and timing of one pulse; times in samples. On failure all ten results are 0. */
TW_API int32_t PulseParameters(Array1DHandle x, double* top, double* base, double* amplitude, double* delay,
                               double* width, double* slew, double* fall, double* rise, double* overshoot,
                               double* undershoot, int32_t* status);

/* Multiply by exp(j (phase + w k)), w = 2 pi frequency / fs; the phase is carried to the next
 * block, reduced to [0, 2 pi). Frequency 0 leaves the signal (and the phase) as it is. */
TW_API void CxComplexModulatorH(Array1DHandle x, double frequency, double fs, double* phase);
TW_API void ReComplexModulatorH(Array1DHandle x, double frequency, double fs, double* phase, Array1DHandle y);

/* Phase and frequency modulation of n samples at x, in place. peak and accumulator are carried
 * between calls; phase receives the final phase in degrees. */
TW_API void PhasMod(int32_t n, double k, double* phase, double carrier, double* x, double* peak,
                    double* accumulator);
TW_API void FreqMod(int32_t n, double k, double* phase, double carrier, double* x, double* peak,
                    double* accumulator);

/* Convolution and correlation. algorithm: 0 direct, 1 frequency domain (transform length the
 * next fast size at or above nx + ny - 1). z gets nx + ny - 1 elements. For the real exports an
 * algorithm other than 0 and 1 computes nothing and succeeds. */
TW_API int32_t Convolution(Array1DHandle x, Array1DHandle y, Array1DHandle z, int32_t* algorithm, int32_t* status);
/* Cross-correlation z = reverse(x) * y, lag 0 at z[nx - 1]. normalization: 0 none, 1 unbiased
 * (each lag divided by its number of terms), 2 biased (divided by max(nx, ny)). Rxy is
 * normalization 0. When x and y are the same block the frequency path takes one transform. */
TW_API int32_t Rxy80(Array1DHandle x, Array1DHandle y, Array1DHandle z, int32_t* algorithm,
                     int32_t normalization, int32_t* status);
TW_API int32_t Rxy(Array1DHandle x, Array1DHandle y, Array1DHandle z, int32_t* algorithm, int32_t* status);
/* x is replaced by its 2n - 1 auto-correlation lags (frequency domain). */
TW_API int32_t AutoCorrelation80(Array1DHandle x, int32_t normalization, int32_t* status);
TW_API int32_t AutoCorrelation(Array1DHandle x, int32_t* status);
/* Complex convolution, or with correlate non-zero the correlation with x conjugated and reversed,
 * normalized as Rxy80. */
TW_API int32_t CxConvolution(Array1DHandle x, Array1DHandle y, Array1DHandle z, int32_t algorithm,
                             int32_t correlate, int32_t normalization);
/* q with y * q = x, nx - ny + 1 samples, stored in x. Divides on a power-of-two transform, or by
 * long division when the divisor's transform is near zero at a tested bin. The status is both
 * returned and stored. */
TW_API int32_t Deconvolution(Array1DHandle x, Array1DHandle y, int32_t* status);

/* Two-dimensional convolution of matrices. sizeMode: 0 full, 1 the size of x from row r2/2 and
 * column c2/2 of the full result (y of r2 x c2), 2 the valid part only. algorithm as above. */
TW_API int32_t Convolve_2DH(Array2DHandle x, Array2DHandle y, Array2DHandle z, int32_t sizeMode, int32_t algorithm);
/* Complex twin; in sizeMode 2 it also refuses matrices with fewer rows than columns. */
TW_API int32_t CxConvolve_2DH(Array2DHandle x, Array2DHandle y, Array2DHandle z, int32_t sizeMode,
                              int32_t algorithm);
/* Full 2-D correlation: x reversed along both dimensions (and conjugated) convolved with y. */
TW_API int32_t Correlation_2DH(Array2DHandle x, Array2DHandle y, Array2DHandle z, int32_t algorithm);
TW_API int32_t CxCorrelation_2DH(Array2DHandle x, Array2DHandle y, Array2DHandle z, int32_t algorithm);

/* ---- Decimation and moving sums ---- */

/* x replaced by x[k factor], or the mean of each group of factor samples (average nonzero), for k
 * below n / factor. */
TW_API int32_t DecimateCIN(Array1DHandle x, int32_t* factor, uint8_t* average, int32_t* status);
TW_API int32_t CxDecimate_H(Array1DHandle x, int32_t factor, int32_t average);
/* Streaming decimation: offset is the index in the next block of the next sample to take (or of
 * the next full group's start); partial samples of an unfinished group sum to *sum. reset clears
 * partial and sum. x is replaced by the outputs of this block. */
TW_API int32_t DecimateContinuous_H(Array1DHandle x, int32_t factor, int32_t average, int32_t* offset,
                                    int32_t reset, int32_t* partial, double* sum);
TW_API int32_t CxDecimateContinuous_H(Array1DHandle x, int32_t factor, int32_t average, int32_t* offset,
                                      int32_t reset, int32_t* partial, ComplexDouble* sum);
/* Block sums (not means) of factor samples written over the front of x, which keeps its size;
 * produced says how many. count samples of an unfinished block are carried in sum. */
TW_API void ReDecimatedMovingAverageH(Array1DHandle x, int32_t factor, double* sum, int32_t* count,
                                      int32_t reset, int32_t* produced);
TW_API void CxDecimatedMovingAverageH(Array1DHandle x, int32_t factor, ComplexDouble* sum, int32_t* count,
                                      int32_t reset, int32_t* produced);
/* stages cascaded moving sums of width samples in place, unscaled. sums (stages values) and
 * window (stages x width) carry the past; position is the next window column. They are rebuilt
 * and zeroed on reset or when their sizes or position do not fit. */
TW_API int32_t ReCascadedMovingAverageH(Array1DHandle x, int32_t stages, int32_t width, Array1DHandle sums,
                                        Array2DHandle window, int32_t* position, int32_t reset);
TW_API int32_t CxCascadedMovingAverageH(Array1DHandle x, int32_t stages, int32_t width, Array1DHandle sums,
                                        Array2DHandle window, int32_t* position, int32_t reset);
/* Cascaded-integrator-comb filters from moving sums of width R D, each scaled by 1 / (R D); mode
 * nonzero alternates signs (the filter moves to half the sampling rate). State: R D + 1 cells per
 * stage, plus the phase for the decimator. The decimator keeps every R-th sample, the
 * interpolator stuffs R x[k] every R samples; delay samples at the start are dropped. */
TW_API int32_t CICDecimatorByMovH(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t stages,
                                  int32_t R, int32_t D, int32_t mode, uint8_t reset, int32_t* delay);
TW_API int32_t CICInterpolatorByMovH(Array1DHandle x, Array1DHandle y, Array1DHandle state, int32_t stages,
                                     int32_t R, int32_t D, int32_t mode, uint8_t reset, int32_t* delay);

/* ---- Resampling ---- */

/* Rational resampling by L / M (gcd 1) with an odd FIR h centred on each output instant:
 * y[k] = L sum_i v[i] h[i L - delay - k M + (taps - 1) / 2], v the stateCount live state samples
 * followed by x. delay is the next output instant in the L-fold upsampled time base, counted from
 * the first live state sample; state keeps (taps - 1) / L + 1 cells per channel. reset empties the
 * state and keeps delay. */
TW_API int32_t RationalResample_H(Array1DHandle x, int32_t L, int32_t M, int32_t reset, int32_t* delay,
                                  Array1DHandle h, Array1DHandle state, int32_t* stateCount, Array1DHandle y);
TW_API int32_t CxRationalResample_H(Array1DHandle x, int32_t L, int32_t M, int32_t reset, int32_t* delay,
                                    Array1DHandle h, Array1DHandle state, int32_t* stateCount, Array1DHandle y);
/* The same on the rows (channels) of x, with one timing; a state without rows is created. */
TW_API int32_t RationalResampleMultiCh_H(Array2DHandle x, int32_t L, int32_t M, int32_t reset, int32_t* delay,
                                         Array1DHandle h, Array2DHandle state, int32_t* stateCount,
                                         Array2DHandle y);
TW_API int32_t CxRationalResampleMCh_H(Array2DHandle x, int32_t L, int32_t M, int32_t reset, int32_t* delay,
                                       Array1DHandle h, Array2DHandle state, int32_t* stateCount, Array2DHandle y);

/* Table resamplers. The table is the impulse response of a lowpass filter at oversample times the
 * input rate, with unit sum, symmetric about its centre; interpolation 1 reads the nearest cell
 * below a position, any other value interpolates linearly. The records are packed. */
#pragma pack(push, 1)
typedef struct {
    double ratio;          /* input samples per output sample */
    int32_t interpolation;
    double start;          /* position of the first output, in input samples */
    NumericHandle table;
    int32_t oversample;
} ResampleSettings;

typedef struct {
    int32_t interpolation;
    uint8_t antiAlias;
    NumericHandle table;
    int32_t oversample;
} VariableSettings;

/* Caller-held state of a constant-ratio resampler: buffered samples, current coefficients and the
 * position of the next output in the buffer. */
typedef struct {
    NumericHandle buffer;
    int32_t count;
    NumericHandle coefs;
    double scale;
    int32_t left;
    int32_t right;
    int32_t interpolation;
    double ratio;
    double frac;
    int32_t index;
} ResampleState;
#pragma pack(pop)

/* Constant-ratio resampling. ratio, interpolation and start are taken from the settings on reset
 * only; table and oversample on every call. y is sized to ceil((n + count) / ratio) and produced
 * says how many outputs it holds. antiAlias widens the filter by the ratio when it exceeds 1. */
TW_API int32_t Resample_Const(Array1DHandle x, ResampleState* state, const ResampleSettings* settings, int32_t reset,
                              Array1DHandle y, int32_t* produced, int32_t antiAlias);
TW_API int32_t CxResample_Const(Array1DHandle x, ResampleState* state, const ResampleSettings* settings,
                                int32_t reset, Array1DHandle y, int32_t* produced, int32_t antiAlias);
/* Resampling at ascending instants `times` (input samples from x[0]); each computable output
 * replaces its time (in the complex twin the times are the real parts). done outputs were made;
 * the caller drops consumed samples of x, and the unreached times and *lastTime are lowered by
 * consumed, ready for the next call with the rest. */
TW_API int32_t Resample_Variable(Array1DHandle x, Array1DHandle times, const VariableSettings* settings,
                                 double* lastTime, int32_t* done, int32_t* consumed);
TW_API int32_t CxResample_Variable(Array1DHandle x, Array1DHandle times, const VariableSettings* settings,
                                   double* lastTime, int32_t* done, int32_t* consumed);
/* The same on the rows of x into y (rows x done); the f64 times are kept and only the unreached
 * ones lowered. */
TW_API int32_t Resample_Variable_MultiCh(Array2DHandle x, Array2DHandle y, Array1DHandle times,
                                         const VariableSettings* settings, double* lastTime, int32_t* done,
                                         int32_t* consumed);
TW_API int32_t CxResample_Variable_MultiCh(Array2DHandle x, Array2DHandle y, Array1DHandle times,
                                           const VariableSettings* settings, double* lastTime, int32_t* done,
                                           int32_t* consumed);

#endif
