// Table holders kept in work cells and instance-data slots by the transforms.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"
#include "transform/fft/fft.hpp"

namespace tw {

// What a work cell or an instance-data slot points to: one table of the list.
struct TableHolder {
    FftTable* table;
};

// Makes the holder in *cell hold the table of length n, reusing it when the size still fits.
// registerCleanup: the plain exports' work cells get a host cleanup that releases the holder;
// instance-data slots are released by TransformUnreserveProc instead.
Status AcquireTableHolder(void** cell, int32_t n, bool registerCleanup, FftTable** table);

// Gives back a holder and what it holds. Accepts null.
void ReleaseTableHolder(void* holder);

}  // namespace tw
