// The FFT tables of one call of a transform export, kept between calls in the caller's cells.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"
#include "transform/fft/fft.hpp"

namespace tw {

// Up to two tables (one per direction of a 2-D transform). A plain export passes one work cell per
// table; an _IDP export passes its instance-data cell, whose record holds the tables in slots 0
// and 1. A null cell gives a table for this call alone.
class CachedTables {
public:
    CachedTables(void** cell0, void** cell1, bool instanceData)
        : cells_{cell0, cell1}, instanceData_(instanceData) {}
    CachedTables(void** cell, bool instanceData) : CachedTables(cell, cell, instanceData) {}
    CachedTables(const CachedTables&) = delete;
    CachedTables& operator=(const CachedTables&) = delete;
    ~CachedTables();

    // The table of length n for slot 0 or 1.
    Status Acquire(int slot, int32_t n, FftTable** table);

private:
    void** cells_[2];
    FftTable* owned_[2] = {nullptr, nullptr};
    bool instanceData_;
};

}  // namespace tw
