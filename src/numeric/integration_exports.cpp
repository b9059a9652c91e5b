#include <cstring>

#include "frame/frame.hpp"
#include "numeric/integration.hpp"
#include "twanlys/numeric.h"

using namespace tw;

namespace {

Status OneD(Handle x, double dt, int32_t method, IntegrationRules rules, double* result) {
    Frame f;
    f.Result(result);
    const int32_t n = Count(x);
    const double* px = nullptr;
    Status s = n < 1 ? EmptyArrayErr : f.In(x, &px);
    if (s == 0) s = Integrate1D(px, n, dt, method, rules, result);
    return f.Finish(s);
}

// Every rule works from 3 samples on (the older ones close a short run with lower rules), except
// the later Bode rule, whose start terms read five samples.
int32_t MinimumDimension(uint16_t method, IntegrationRules rules) {
    return rules == IntegrationRules::LeftoverAtStart && method == 3 ? 5 : 3;
}

Status TwoD(Handle data, Handle spacing, uint16_t method, IntegrationRules rules, double* result) {
    Frame f;
    f.Result(result);
    const Shape d = Dims(data);
    const int32_t minimum = MinimumDimension(method, rules);
    const double *x = nullptr, *step = nullptr;
    Status s = (d.rows < 1 || d.cols < 1)                   ? EmptyArrayErr
               : (d.rows < minimum || d.cols < minimum)     ? SizeMismatchErr
               : Count(spacing) < 2                          ? TooFewSamples2Err
               : method > 3                                  ? InvalidSelectorErr
                                                             : f.In2D(data, &x);
    if (s == 0) s = f.In(spacing, &step);
    if (s == 0) s = IntegrateGrid(x, d.rows, d.cols, 1, step, method, rules, result);
    return f.Finish(s);
}

// The 3-D block: three i32 dimensions, then the elements, which a packed host leaves 4-byte
// aligned; they are copied to aligned scratch in that case.
Status ThreeD(Handle data, Handle spacing, uint16_t method, IntegrationRules rules, double* result) {
    Frame f;
    f.Result(result);
    const int32_t d0 = ReadWord(data, 0), d1 = ReadWord(data, 1), d2 = ReadWord(data, 2);
    const int32_t minimum = MinimumDimension(method, rules);
    const double* step = nullptr;
    Status s = (d0 < 1 || d1 < 1 || d2 < 1)                         ? EmptyArrayErr
               : (d0 < minimum || d1 < minimum || d2 < minimum)     ? SizeMismatchErr
               : Count(spacing) < 3                                  ? TooFewSamples3Err
               : method > 3                                          ? InvalidSelectorErr
                                                                     : f.In(spacing, &step);
    Scratch<double> copy;
    const double* x = nullptr;
    if (s == 0) {
        const auto* elements = static_cast<const unsigned char*>(*data) + 12;
        const size_t n = static_cast<size_t>(d0) * static_cast<size_t>(d1) * static_cast<size_t>(d2);
        if (reinterpret_cast<uintptr_t>(elements) % alignof(double) == 0) {
            x = reinterpret_cast<const double*>(elements);
        } else if ((s = copy.Allocate(n)) == 0) {
            std::memcpy(copy.get(), elements, n * sizeof(double));
            x = copy.get();
        }
    }
    if (s == 0) s = IntegrateGrid(x, d0, d1, d2, step, method, rules, result);
    return f.Finish(MergeRelease(s, copy.Release()));
}

}  // namespace

TW_API int32_t NumerIntegration_head(Array1DHandle x, double* dt, int32_t* method, double* result,
                                     int32_t* status) {
    return ToPointer(status, OneD(x, *dt, *method, IntegrationRules::Older, result));
}

TW_API int32_t NumerIntegration_2017_head(Array1DHandle x, double* dt, int32_t* method, double* result) {
    return OneD(x, *dt, *method, IntegrationRules::LeftoverAtStart, result);
}

TW_API int32_t NumerIntegration2D_head(Array2DHandle data, Array1DHandle spacing, uint16_t method,
                                       double* result) {
    return TwoD(data, spacing, method, IntegrationRules::Older, result);
}

TW_API int32_t NumerIntegration2D_2017_head(Array2DHandle data, Array1DHandle spacing, uint16_t method,
                                            double* result) {
    return TwoD(data, spacing, method, IntegrationRules::LeftoverAtStart, result);
}

TW_API int32_t NumerIntegration3D_head(NumericHandle data, Array1DHandle spacing, uint16_t method,
                                       double* result) {
    return ThreeD(data, spacing, method, IntegrationRules::Older, result);
}

TW_API int32_t NumerIntegration3D_2017_head(NumericHandle data, Array1DHandle spacing, uint16_t method,
                                            double* result) {
    return ThreeD(data, spacing, method, IntegrationRules::LeftoverAtStart, result);
}
