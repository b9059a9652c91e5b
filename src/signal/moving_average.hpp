// Recursive moving sums: decimated block sums, cascaded circular moving sums, and the moving-sum
// stage from which the cascaded-integrator-comb decimator and interpolator are built. Every
// routine carries its past in caller-held values, so a stream cut anywhere gives one block.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// Block sums of `factor` samples written over the front of x; *count samples of an unfinished
// block are already in *sum. Returns how many sums were written.
template <class T>
int32_t DecimatedMovingSum(T* x, int32_t n, int32_t factor, T* sum, int32_t* count);

// `stages` moving sums of width `width` in place. sums[stage] is the running sum of a stage and
// window row `stage` its circular buffer of past inputs; position (0 .. width - 1) is the next
// cell to replace.
template <class T>
void CascadedMovingSum(T* x, int32_t n, int32_t stages, int32_t width, T* sums, T* window, int32_t position);

// One moving sum of width w from u into v (distinct blocks). cells holds the w past inputs, oldest
// first, then the running value. mode 0 sums; any other mode alternates the signs, which moves
// the filter to half the sampling rate. Every output is scaled by gain / w.
Status MovingSumStage(const double* u, int32_t n, int32_t w, int32_t mode, double gain, double* cells,
                      double* v);

// State cells of a CIC chain (one moving sum of width R D per stage, plus the phase cell of the
// decimator), or -1 when that overflows an i32.
int32_t CicStateCells(int32_t stages, int32_t r, int32_t d, bool decimator);

// First picked sample and output count of a CIC decimator block of n samples.
struct CicPick {
    int32_t first;
    int32_t count;
    double phase;  // the phase cell after the block
};
CicPick CicDecimatorPick(int32_t n, int32_t r, int32_t delay, double phase);

// The decimator: the stages over x, then every r-th sample from pick.first into y (pick.count
// samples). Updates the state and *delay.
Status CicDecimate(const double* x, int32_t n, int32_t stages, int32_t r, int32_t d, int32_t mode,
                   CicPick pick, double* state, int32_t* delay, double* y);

// Output count of the interpolator for n inputs.
int32_t CicInterpolatorCount(int32_t n, int32_t r, int32_t delay);

// The interpolator: x stuffed with zeros to n r samples (r x[k] at k r), the stages, then the first
// *delay samples cut away into y of CicInterpolatorCount samples.
Status CicInterpolate(const double* x, int32_t n, int32_t stages, int32_t r, int32_t d, int32_t mode,
                      double* state, int32_t* delay, double* y);

}  // namespace tw
