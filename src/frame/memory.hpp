// The two memory doors of every core routine.
//
// Plain memory comes from the process heap and is for tables, plans and records that outlive a
// call. Scratch memory lives for one call and is routed: to the heap, or to the Analysis Workspace
// arena while that is switched on. Every scratch block carries a 16-byte header (total size and
// allocator kind) so that it always goes back to the allocator that gave it, and the memory handed
// out is 16-byte aligned either way.
#pragma once

#include <cstddef>
#include <cstdint>
#include <utility>

#include "twanlys/status.h"

namespace tw {

using Status = int32_t;

void* PlainAlloc(size_t bytes);
void* PlainZeroAlloc(size_t bytes);
void* PlainRealloc(void* p, size_t bytes);
void PlainFree(void* p);

// 0 or OutOfMemoryErr; the cell holds the block or null.
Status ScratchAlloc(void** cell, size_t bytes);
// The block, or null on failure.
void* ScratchAlloc(size_t bytes);
// Accepts null. The status of the release (0 unless the allocator reports one).
Status ScratchFree(void* p);
// A null cell allocates; 0 bytes releases and nulls the cell. On failure the old block stands.
Status ScratchRealloc(void** cell, size_t bytes);

inline constexpr size_t kScratchHeader = 16;

// The status merge of a release: it replaces the running status only if that is 0, or positive
// while the release failed.
constexpr Status MergeRelease(Status running, Status release) {
    return (running == 0 || (running > 0 && release < 0)) ? release : running;
}

// Scratch array released on every path. Release() hands its status on for merging.
template <class T>
class Scratch {
public:
    Scratch() = default;
    Scratch(const Scratch&) = delete;
    Scratch& operator=(const Scratch&) = delete;
    ~Scratch() { ScratchFree(p_); }

    Status Allocate(size_t count) {
        Release();
        return ScratchAlloc(reinterpret_cast<void**>(&p_), count * sizeof(T));
    }
    Status Release() { return ScratchFree(std::exchange(p_, nullptr)); }
    T* get() const { return p_; }
    T& operator[](size_t i) const { return p_[i]; }

private:
    T* p_ = nullptr;
};

}  // namespace tw
