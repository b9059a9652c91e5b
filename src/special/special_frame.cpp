#include "special/special_frame.hpp"

namespace tw {

void SpecialReport(SpecialFunction, SpecialFault) {}

Status AmosStatus(int32_t ierr) {
    // Index: the error flag. 3 keeps the value (precision reduced by a large argument).
    static constexpr Status kByFlag[] = {
        0,
        SpecialFunctionInputErr,
        DomainSingularityErr,
        MatrixFunctionAccuracyWarn,
        SpecialFunctionDomainErr,
        NoConvergenceErr,
    };
    constexpr int32_t n = static_cast<int32_t>(sizeof kByFlag / sizeof kByFlag[0]);
    return (ierr >= 0 && ierr < n) ? kByFlag[ierr] : InternalErr;
}

}  // namespace tw
