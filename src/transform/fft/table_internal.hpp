// Parts of the table build shared between the list and the Rader stages.
#pragma once

#include "transform/fft/fft.hpp"

namespace tw::fft {

// With the table lock held: the list's table of length n (one reference added), or null.
FftTable* CreateLocked(int32_t n);
void DestroyLocked(FftTable* t);

// exp(-i j theta) for j = first .. last, by the two-sine recurrence in extended precision,
// stored at re[(j - first) step], im[(j - first) step].
void ExpRun(long double theta, int32_t first, int32_t last, double* re, double* im, ptrdiff_t step);

inline constexpr double kTwoPi = 6.283185307179586;

// With the table lock held: fills the Rader parts of a stage of prime p (false when out of
// memory; the caller then releases what the stage holds).
bool SetupRaderStage(FftStage* st, int32_t p);
void ReleaseRaderStage(FftStage* st);

}  // namespace tw::fft
