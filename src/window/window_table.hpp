// The window numbering, the cosine-sum coefficients and the tabulated window constants.
#pragma once

#include <cstdint>

namespace tw {

enum WindowNumber : int32_t {
    kRectangular = 0,
    kHann = 1,
    kHamming = 2,
    kBlackmanHarris3 = 3,
    kExactBlackman = 4,
    kBlackman = 5,
    kFlatTop = 6,
    kBlackmanHarris4 = 7,
    kBlackmanHarris7 = 8,
    kLowSideLobe = 9,
    kBlackmanNuttall = 11,
    kCosineTaper = 12,
    kTriangle = 30,
    kBartlettHann = 31,
    kBohman = 32,
    kParzen = 33,
    kWelch = 34,
    kKaiser = 60,
    kDolphChebyshev = 61,
    kGaussian = 62,
    kForce = 64,
    kExponential = 65,
};

struct CosineSumRow {
    int32_t number;
    int32_t terms;
    double a[7];
};

inline constexpr CosineSumRow kCosineSums[] = {
    {kHann, 2, {0.5, 0.5}},
    {kHamming, 2, {0.54, 0.46}},
    {kBlackmanHarris3, 3, {0.42323, 0.49755, 0.07922}},
    {kExactBlackman, 3, {0.4265907136715391, 0.4965606190885641, 0.07684866723989682}},
    {kBlackman, 3, {0.42, 0.5, 0.08}},
    {kFlatTop, 5, {0.215578948, 0.41663158, 0.277263158, 0.083578947, 0.006947368}},
    {kBlackmanHarris4, 4, {0.35875, 0.48829, 0.14128, 0.01168}},
    {kBlackmanHarris7,
     7,
     {0.27105140069342415, 0.43329793923448606, 0.21812299954311062, 0.0659254463880309, 0.010811742098372268,
      0.0007765848252250934, 1.3887217350903198e-05}},
    {kLowSideLobe, 5, {0.323215218, 0.471492057, 0.17553428, 0.028497078, 0.001261367}},
    {kBlackmanNuttall, 4, {0.3635819, 0.4891775, 0.1365995, 0.0106411}},
};

// Null when the number is not a cosine sum.
inline const CosineSumRow* FindCosineSum(int32_t number) {
    for (const CosineSumRow& row : kCosineSums)
        if (row.number == number) return &row;
    return nullptr;
}

struct ConstantsRow {
    int32_t number;
    double enbw;
    double gain;
};

// Only the rows of the rectangular window and the cosine sums are ever read: the windows 31 to
// 34 take their constants from the window itself. Their rows are kept as data.
inline constexpr ConstantsRow kTabulatedConstants[] = {
    {kRectangular, 1, 1},
    {kHann, 1.5, 0.5},
    {kHamming, 1.362826, 0.54},
    {kBlackmanHarris3, 1.708538, 0.42323},
    {kExactBlackman, 1.693699, 0.42659071367},
    {kBlackman, 1.726757, 0.42},
    {kFlatTop, 3.770246506303, 0.215578948},
    {kBlackmanHarris4, 2.004353, 0.35875},
    {kBlackmanHarris7, 2.631905, 0.27105140069342415},
    {kLowSideLobe, 2.215350782519, 0.323215218},
    {kBlackmanNuttall, 1.9761117, 0.3635819},
    {kBartlettHann, 1.45584787, 0.5},
    {kBohman, 1.78574087544, 0.40528473457},
    {kParzen, 1.91746031746, 0.375},
    {kWelch, 1.2, 0.66666667},
};

inline const ConstantsRow* FindTabulatedConstants(int32_t number) {
    for (const ConstantsRow& row : kTabulatedConstants)
        if (row.number == number) return &row;
    return nullptr;
}

}  // namespace tw
