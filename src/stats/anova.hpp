// Analysis of variance over labelled observations, and the contingency-table chi-square test.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"

namespace tw {

struct OneWayResult {
    double betweenSS, betweenMS, f, p, withinSS, withinMS, totalSS, criticalF;
};

// k levels, at least one observation each, any group sizes.
Status OneWayAnova(const double* x, const int32_t* labels, int32_t n, int32_t k, double alpha,
                   OneWayResult* r);

// Rows of a factorial table, each of kAnovaColumns: SS, degrees, MS, F, critical F.
inline constexpr int32_t kAnovaColumns = 5;
inline constexpr int32_t kTwoWayRows = 4;
inline constexpr int32_t kThreeWayRows = 8;

// Balanced factorial designs. labels[f] and levels[f] belong to factor f (A, B, C); a negative
// level count makes the factor random. table receives rows x kAnovaColumns values and p one
// value per row but the error row.
Status TwoWayAnova(const double* x, const int32_t* const labels[2], int32_t n, int32_t repeats,
                   const int32_t levels[2], double alpha, double* table, double* p);
Status ThreeWayAnova(const double* x, const int32_t* const labels[3], int32_t n, int32_t repeats,
                     const int32_t levels[3], double alpha, double* table, double* p);

// Chi-square statistic of a rows x cols table of counts, and its upper-tail probability.
Status ContingencyChiSquare(const int32_t* counts, int32_t rows, int32_t cols, double* chiSquare,
                            double* p);

}  // namespace tw
