#include "transform/fft/holder.hpp"

#include "frame/frame.hpp"
#include "frame/host_link.hpp"
#include "twanlys/link.h"

namespace tw {
namespace {

void HolderCleanup(void* holder) { ReleaseTableHolder(holder); }

}  // namespace

void ReleaseTableHolder(void* holder) {
    if (holder == nullptr) return;
    DestroyFftTable(static_cast<TableHolder*>(holder)->table);
    PlainFree(holder);
}

Status AcquireTableHolder(void** cell, int32_t n, bool registerCleanup, FftTable** table) {
    *table = nullptr;
    if (*cell == nullptr) {
        *cell = PlainZeroAlloc(sizeof(TableHolder));
        if (*cell == nullptr) return OutOfMemoryErr;
    }
    auto* holder = static_cast<TableHolder*>(*cell);
    if (holder->table == nullptr) {
        holder->table = CreateFftTable(n);
        if (holder->table == nullptr) {
            PlainFree(holder);
            *cell = nullptr;
            return OutOfMemoryErr;
        }
        if (registerCleanup) HostSetCleanup(&HolderCleanup, holder, 2);
    } else if (holder->table->size != n) {
        DestroyFftTable(holder->table);
        holder->table = CreateFftTable(n);
        if (holder->table == nullptr) {
            if (registerCleanup) HostSetCleanup(&HolderCleanup, holder, 0);
            PlainFree(holder);
            *cell = nullptr;
            return OutOfMemoryErr;
        }
    }
    *table = holder->table;
    return 0;
}

}  // namespace tw

// The instance-data record of the transforms holds a table holder in each slot.
TW_API int32_t TransformUnreserveProc(void** cell) {
    if (cell == nullptr || *cell == nullptr) return 0;
    auto* record = static_cast<tw::InstanceRecord*>(*cell);
    for (void*& slot : record->slot) {
        tw::ReleaseTableHolder(slot);
        slot = nullptr;
    }
    tw::PlainFree(record);
    *cell = nullptr;
    return 0;
}
