// Resamplers on streams. The rational family changes the rate by L / M with a caller's odd FIR,
// centred on each output instant; the table family reads a caller's oversampled lowpass table
// at fractional offsets. What is fixed here is the timing and the state kept between blocks.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// ---- Rational L / M ----

// The timing of one block, shared by all channels. The stream v is the stateCount live state
// samples followed by the n new ones; instants are counted in the L-fold upsampled time base
// from v[0].
struct RationalPlan {
    int32_t count;  // outputs of this block
    int64_t drop;   // leading samples of v no longer needed
    int32_t keep;   // samples of v that become the state
    int32_t delay;  // the next output instant, from the first kept sample
};

// The plan of a block, or DomainSingularityErr when the kept samples exceed `cells`.
Status PlanRationalBlock(int32_t n, int32_t stateCount, int32_t l, int32_t m, int32_t taps, int32_t delay,
                         int32_t cells, RationalPlan* plan);

// State cells per channel for a filter of `taps` and upsampling l.
inline int32_t RationalStateCells(int32_t taps, int32_t l) { return (taps - 1) / l + 1; }

// h regrouped by phase (phase p: h[p], h[p + l], ... contiguously from start[p]); phases at or
// above taps are empty. poly holds taps values, start min(l, taps) + 1.
void PolyphaseSplit(const double* h, int32_t taps, int32_t l, double* poly, int32_t* start);

// y[k] = l * sum over i of v[i] h[i l - t + c], t = delay + k m, c = (taps - 1) / 2, for the
// plan's count outputs.
template <class T>
void RationalFilter(const T* v, const double* poly, const int32_t* start, int32_t taps, int32_t l, int32_t m,
                    int32_t delay, int32_t count, T* y);

// ---- Table resamplers ----

// A lowpass table of length `size` at `oversample` times the input rate, symmetric about
// (size - 1) / 2, read nearest (interpolation 1) or linearly.
struct Table {
    const double* cells;
    int32_t size;
    int32_t oversample;
    int32_t interpolation;
};

// The filter at ratio r and fraction f in [0, 1): left + right coefficients and their scale.
struct TablePositions {
    int32_t left;
    int32_t right;
    double scale;
};

// left and right for r clamped into [1, oversample].
TablePositions TableReach(const Table& t, double r, double f);

// Fills coef with the left + right coefficients at (r, f).
TablePositions TableCoefficients(const Table& t, double r, double f, double* coef);

// Coefficients the filter at ratio r can need for any fraction.
int32_t TableWidth(const Table& t, double r);

// scale * sum over m of coef[left + right - 1 - m] v[i + right - m], v read as 0 before index 0.
template <class T>
T TableOutput(const T* v, int64_t i, const TablePositions& p, const double* coef);

// The scalar fields of a constant-ratio resampler's state.
struct ConstResampler {
    int32_t count;  // live samples in the buffer
    double scale;
    int32_t left;
    int32_t right;
    int32_t interpolation;
    double ratio;   // input samples per output
    double frac;    // fraction of the next output instant
    int32_t index;  // integer part of it, from the start of the buffer
};

// One block at a constant ratio over v = the count live buffer samples followed by x (total
// samples). Writes up to `capacity` outputs into y (ResampleSizeErr beyond), keeps the current
// coefficients in coef (BufferTooSmallErr if they need more than coefCells), and sets *drop to
// the leading samples of v that the buffer no longer needs.
template <class T>
Status ResampleConstBlock(const Table& t, double filterRatio, const T* v, int64_t total, ConstResampler* st,
                          double* coef, int32_t coefCells, T* y, int32_t capacity, int32_t* produced,
                          int64_t* drop);

struct VariableResult {
    int32_t done;
    int32_t consumed;
    double last;
};

// Outputs at the ascending instants `times` (input samples from x[0]) on each of `rows` rows of x
// (rows x n) into out (rows x m), until one needs samples past x. With antiAlias each output's
// filter widens by its gap to the previous instant (`last` before the first).
template <class T>
Status ResampleVariableBlock(const Table& t, bool antiAlias, const T* x, int32_t rows, int32_t n,
                             const double* times, int32_t m, double last, T* out, VariableResult* result);

}  // namespace tw
