// Two-sided power and cross spectra, normalised by the square of the length so that a DC offset A
// gives A squared at bin 0. Results stand in the order of the DFT (mirrored, not one-sided).
#pragma once

#include <cstdint>

#include "frame/frame.hpp"
#include "transform/fft/fft.hpp"

namespace tw {

// |X[k]|^2 / n^2 of real x, replacing x. The table has length n.
Status PowerSpectrum(const FftTable* table, double* x, int32_t n);
Status PowerSpectrum(const FftTable* table, const cdouble* x, double* y, int32_t n);

// conj(X[k]) Y[k] / n^2.
Status CrossSpectrum(const FftTable* table, const double* x, const double* y, cdouble* z, int32_t n);
Status CrossSpectrum(const FftTable* table, const cdouble* x, const cdouble* y, cdouble* z, int32_t n);

}  // namespace tw
