#include "frame/frame.hpp"
#include "transform/fft/holder.hpp"
#include "twanlys/link.h"

namespace {

// What a measurement keeps in an instance-data cell: a histogram bin buffer and its size.
struct BinBufferRecord {
    int32_t size;
    void* bins;
};

}  // namespace

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

TW_API int32_t MeasurementUnreserveProc(void** cell) {
    if (cell == nullptr || *cell == nullptr) return 0;
    auto* record = static_cast<BinBufferRecord*>(*cell);
    tw::PlainFree(record->bins);
    record->bins = nullptr;
    record->size = 0;
    tw::PlainFree(record);
    *cell = nullptr;
    return 0;
}
