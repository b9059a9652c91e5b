/* Analysis of variance over labelled observations, and the chi-square test of a contingency table.
 *
 * Observations are a 1-D f64 array; each factor has a 1-D i32 array of labels, one per
 * observation. Labels are arbitrary integers and levels are numbered in order of first
 * appearance. In the two- and three-way designs a negative level count marks a random factor;
 * its magnitude is the number of levels. Repeats are the observations per cell.
 *
 * The table of results has one row per effect (two-way: A, B, AB, error; three-way: A, B, C, AB,
 * AC, BC, ABC, error) and the columns sum of squares, degrees of freedom, mean square, F and, in
 * the _2017 exports, the critical F at significance alpha. The error row's F and critical F are 0.
 * A row without an exact F ratio (three-way, some random designs) holds F, critical F and p of
 * -1. The status goes through the last argument; on any non-zero status every f64 output is NaN
 * and the table is 0 by 0. */
#ifndef TWANLYS_ANOVA_H
#define TWANLYS_ANOVA_H

#include "twanlys/types.h"

TW_API int32_t Anova1Way_head(Array1DHandle data, Array1DHandle labels, const int32_t* k,
                              double* betweenSS, double* betweenMS, double* f, double* p,
                              double* withinSS, double* withinMS, double* totalSS, int32_t* status);
TW_API int32_t Anova1Way_head_2017(Array1DHandle data, Array1DHandle labels, const int32_t* k,
                                   double alpha, double* betweenSS, double* betweenMS, double* f,
                                   double* p, double* withinSS, double* withinMS, double* totalSS,
                                   double* criticalF, int32_t* status);

TW_API int32_t Anova2Way_head(Array1DHandle data, Array1DHandle aLabels, Array1DHandle bLabels,
                              const int32_t* repeats, const int32_t* a, const int32_t* b,
                              Array2DHandle table, double* pA, double* pB, double* pAB,
                              int32_t* status);
TW_API int32_t Anova2Way_head_2017(Array1DHandle data, Array1DHandle aLabels, Array1DHandle bLabels,
                                   const int32_t* repeats, const int32_t* a, const int32_t* b,
                                   double alpha, Array2DHandle table, double* pA, double* pB,
                                   double* pAB, int32_t* status);

TW_API int32_t ANOVA3Way_head(Array1DHandle data, Array1DHandle aLabels, Array1DHandle bLabels,
                              Array1DHandle cLabels, const int32_t* repeats, const int32_t* a,
                              const int32_t* b, const int32_t* c, Array2DHandle table, double* pA,
                              double* pB, double* pC, double* pAB, double* pAC, double* pBC,
                              double* pABC, int32_t* status);
TW_API int32_t ANOVA3Way_head_2017(Array1DHandle data, Array1DHandle aLabels, Array1DHandle bLabels,
                                   Array1DHandle cLabels, const int32_t* repeats, const int32_t* a,
                                   const int32_t* b, const int32_t* c, double alpha,
                                   Array2DHandle table, double* pA, double* pB, double* pC,
                                   double* pAB, double* pAC, double* pBC, double* pABC,
                                   int32_t* status);

/* table: 2-D i32 counts, at least 2 by 2. A row or column of zeros gives NaN with status 0. */
TW_API int32_t Contingency_head(Array2DHandle table, double* chiSquare, double* p, int32_t* status);

#endif
