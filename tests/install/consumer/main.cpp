// A program outside the project: built against an installed tree only.
#include <cstdio>

#include "twanlys/stats.h"
#include "twrt.hpp"

int main() {
    const twrt::Array1D<double> x{3, 1, 2, 4};
    double median = 0;
    int32_t status = -1;
    Median_head(x.h(), &median, &status);
    std::printf("median %g, status %d\n", median, status);
    return median == 2.5 && status == 0 ? 0 : 1;
}
