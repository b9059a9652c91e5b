// Windows by number: dispatch, scaling by the coherent gain, the symmetric form and the window
// constants.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"
#include "twanlys/windows.h"

namespace tw {

// The parameter as the numbered exports pass it on: NaN (and, for 61 and 62, a negative value)
// takes the window's default, windows without a parameter get 0, and 61 turns dB into a ratio.
double WindowParameter(int32_t number, double p);

// Multiplies x by the window in its plain form: periodic and unscaled.
template <class T>
Status ApplyWindow(T* x, int32_t n, int32_t number, double p);

// scaled and symmetric exclude each other; p is the parameter as given to the export.
template <class T>
Status AllWindow(T* x, int32_t n, int32_t number, double p, int32_t scaled, int32_t symmetric);

// The window divided by its coherent gain, so that a unit sinusoid keeps its amplitude, and the
// window's constants.
template <class T>
Status ScaledWindow(T* x, int32_t n, int32_t number, double p, WindowConstants* constants);

// The window symmetric about (n-1)/2.
template <class T>
Status SymmetricWindow(T* x, int32_t n, int32_t number, double p);

// The cosine sums (and the rectangular window) by number only.
template <class T>
Status CosineSumByNumber(T* x, int32_t n, int32_t number, int32_t scaled);

// Constants of the window of length n: tabulated for the cosine sums, measured otherwise.
Status WindowConstantsByNumber(int32_t n, int32_t number, double p, WindowConstants* constants);

// Coherent gain S / n and equivalent noise bandwidth n Q / S^2 of the window w; NaN for n < 1.
void NumericWindowConstants(const double* w, int32_t n, WindowConstants* constants);

}  // namespace tw
