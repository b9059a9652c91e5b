#include "transform/fft/cached_tables.hpp"

#include "frame/frame.hpp"
#include "transform/fft/holder.hpp"

namespace tw {

CachedTables::~CachedTables() {
    for (FftTable* t : owned_) DestroyFftTable(t);
}

Status CachedTables::Acquire(int slot, int32_t n, FftTable** table) {
    *table = nullptr;
    void** cell = cells_[slot];
    if (cell == nullptr) {
        DestroyFftTable(owned_[slot]);
        owned_[slot] = *table = CreateFftTable(n);
        return *table == nullptr ? OutOfMemoryErr : 0;
    }
    if (!instanceData_) return AcquireTableHolder(cell, n, true, table);
    InstanceRecord* record = AcquireInstanceRecord(cell);
    if (record == nullptr) return OutOfMemoryErr;
    return AcquireTableHolder(&record->slot[slot], n, false, table);
}

}  // namespace tw
