/* Windows. Every array export multiplies its array x in place by a window of x's own length and
 * returns the status; on failure x is emptied. The Cx exports take ComplexDouble arrays and scale
 * real and imaginary parts alike. Windows are periodic (symmetric about n/2) unless they say
 * otherwise.
 *
 * Window numbers: 0 rectangular, 1 Hann, 2 Hamming, 3 three-term Blackman-Harris, 4 exact
 * Blackman, 5 Blackman, 6 flat top, 7 four-term Blackman-Harris, 8 seven-term Blackman-Harris,
 * 9 low side lobe, 11 Blackman-Nuttall, 12 cosine taper (fraction, default 0.2), 30 triangle,
 * 31 Bartlett-Hanning, 32 Bohman, 33 Parzen, 34 Welch, 60 Kaiser (beta, default 0),
 * 61 Dolph-Chebyshev (side-lobe level in dB, default 60), 62 Gaussian (sigma, default 0.2),
 * 64 force (duty in percent, default 50), 65 exponential (final value, default 0.1). */
#ifndef TWANLYS_WINDOWS_H
#define TWANLYS_WINDOWS_H

#include "twanlys/types.h"

/* The constants of a window: equivalent noise bandwidth in bins, then coherent gain. */
typedef struct {
    double enbw;
    double coherentGain;
} WindowConstants;

/* Parametric windows. */
TW_API int32_t TriangleWinH(Array1DHandle x);
TW_API int32_t CxTriangleWinH(Array1DHandle x);
TW_API int32_t BartHannWinH(Array1DHandle x);
TW_API int32_t CxBartHannWinH(Array1DHandle x);
TW_API int32_t BohmanWinH(Array1DHandle x);
TW_API int32_t CxBohmanWinH(Array1DHandle x);
TW_API int32_t ParzenWinH(Array1DHandle x);
TW_API int32_t CxParzenWinH(Array1DHandle x);
TW_API int32_t WelchWinH(Array1DHandle x);
TW_API int32_t CxWelchWinH(Array1DHandle x);
TW_API int32_t KaiserH(Array1DHandle x, double beta);
TW_API int32_t CxKaiserH(Array1DHandle x, double beta);
/* s: main lobe to side lobe ratio (linear, below 1 counts as 1); symmetric 0 is periodic. */
TW_API int32_t DolChebyWinH(Array1DHandle x, double s, int32_t symmetric);
TW_API int32_t CxDolChebyWinH(Array1DHandle x, double s, int32_t symmetric);
/* sigma at most 0 counts as 0.2; symmetric 0 is periodic. */
TW_API int32_t GaussWinH(Array1DHandle x, double sigma, int32_t symmetric);
TW_API int32_t CxGaussWinH(Array1DHandle x, double sigma, int32_t symmetric);
TW_API int32_t ForceWinH(Array1DHandle x, double duty);
TW_API int32_t CxForceWinH(Array1DHandle x, double duty);
TW_API int32_t ExpWinH(Array1DHandle x, double final);
TW_API int32_t CxExpWinH(Array1DHandle x, double final);
/* Symmetric about (n-1)/2; a fraction of 1 or more gives the Hann window. */
TW_API int32_t CosTaperedH(Array1DHandle x, double fraction);
TW_API int32_t CxCosTaperedH(Array1DHandle x, double fraction);

/* The same with the status through the last argument. */
TW_API int32_t TriangleWin(Array1DHandle x, int32_t* status);
TW_API int32_t CosTapered(Array1DHandle x, double fraction, int32_t* status);
TW_API int32_t Kaiser_Bessel(Array1DHandle x, double beta, int32_t* status);
TW_API int32_t ForceWindCIN(Array1DHandle x, double duty, int32_t* status);
TW_API int32_t ExpWindCIN(Array1DHandle x, double final, int32_t* status);

/* Windows by number. AllWinH: a NaN parameter takes the window's default (for 61 and 62 also a
 * negative one), and 61 takes its parameter in dB; scaled divides by the coherent gain,
 * symmetric builds the form symmetric about (n-1)/2; the two flags exclude each other. */
TW_API int32_t AllWinH(Array1DHandle x, int32_t window, double parameter, int32_t scaled, int32_t symmetric);
TW_API int32_t CxAllWinH(Array1DHandle x, int32_t window, double parameter, int32_t scaled,
                         int32_t symmetric);
/* The next five take the parameter as it is: 61 as a linear ratio, no defaults. */
TW_API int32_t ScaledWinH(Array1DHandle x, int32_t window, double parameter, WindowConstants* constants);
TW_API int32_t CxScaledWinH(Array1DHandle x, int32_t window, double parameter, WindowConstants* constants);
TW_API int32_t SymmWinH(Array1DHandle x, int32_t window, double parameter);
TW_API int32_t CxSymmWinH(Array1DHandle x, int32_t window, double parameter);
/* Constants of the window of length n; NaN on failure. */
TW_API int32_t WinConstByNameH(int32_t n, int32_t window, double parameter, WindowConstants* constants);
/* The same with the parameter defaults and dB translation of AllWinH. */
TW_API int32_t WinConstByNameH_2016(int32_t n, int32_t window, double parameter, WindowConstants* constants);
/* Constants of the window w itself; NaN for an empty w. */
TW_API void NumWinConstH(Array1DHandle w, WindowConstants* constants);

/* Cosine sums: by number (0 to 9, 11), or from the coefficients a, applied as
 * sum over j of (-1)^j a[j] cos(2 pi j k / n). Scaled divides by a[0], the coherent gain. */
TW_API int32_t AllCosWinH(Array1DHandle x, int32_t window, int32_t scaled);
TW_API int32_t CxAllCosWinH(Array1DHandle x, int32_t window, int32_t scaled);
TW_API int32_t GenCosWinH(Array1DHandle x, Array1DHandle a);
TW_API int32_t CxGenCosWinH(Array1DHandle x, Array1DHandle a);
TW_API int32_t ScaledGenCosWinH(Array1DHandle x, Array1DHandle a);
TW_API int32_t ScaledCxGenCosWinH(Array1DHandle x, Array1DHandle a);

#endif
