#include "frame/memory.hpp"

#include <cstdlib>
#include <cstring>

#include "frame/workspace.hpp"

namespace tw {
namespace {

struct ScratchHeader {
    uint64_t total;
    uint64_t kind;
};
static_assert(sizeof(ScratchHeader) == kScratchHeader);

ScratchHeader* HeaderOf(void* p) { return static_cast<ScratchHeader*>(p) - 1; }

void* RawAlloc(AllocatorKind kind, size_t total) {
    return kind == kAllocArena ? ArenaAllocate(total) : PlainAlloc(total);
}

}  // namespace

void* PlainAlloc(size_t bytes) { return std::malloc(bytes == 0 ? 1 : bytes); }
void* PlainZeroAlloc(size_t bytes) { return std::calloc(1, bytes == 0 ? 1 : bytes); }
void* PlainRealloc(void* p, size_t bytes) { return std::realloc(p, bytes == 0 ? 1 : bytes); }
void PlainFree(void* p) { std::free(p); }

void* ScratchAlloc(size_t bytes) {
    if (bytes > SIZE_MAX - 64) return nullptr;
    const size_t total = bytes + kScratchHeader;
    const AllocatorKind kind = ScratchRoute();
    auto* header = static_cast<ScratchHeader*>(RawAlloc(kind, total));
    if (header == nullptr) return nullptr;
    header->total = total;
    header->kind = kind;
    return header + 1;
}

Status ScratchAlloc(void** cell, size_t bytes) {
    *cell = ScratchAlloc(bytes);
    return *cell == nullptr ? OutOfMemoryErr : 0;
}

Status ScratchFree(void* p) {
    if (p == nullptr) return 0;
    ScratchHeader* header = HeaderOf(p);
    if (header->kind == kAllocArena)
        ArenaRelease(header);
    else
        PlainFree(header);
    return 0;
}

Status ScratchRealloc(void** cell, size_t bytes) {
    if (*cell == nullptr) return ScratchAlloc(cell, bytes);
    if (bytes == 0) {
        const Status s = ScratchFree(*cell);
        *cell = nullptr;
        return s;
    }
    if (bytes > SIZE_MAX - 64) return OutOfMemoryErr;
    ScratchHeader* header = HeaderOf(*cell);
    const size_t total = bytes + kScratchHeader;
    if (header->kind == kAllocArena) {
        const size_t capacity = ArenaCapacity(header);
        if (total < capacity) return 0;
        void* fresh = ScratchAlloc(bytes);
        if (fresh == nullptr) return OutOfMemoryErr;
        std::memcpy(fresh, *cell, capacity - kScratchHeader);
        const Status s = ScratchFree(*cell);
        *cell = fresh;
        return s;
    }
    auto* moved = static_cast<ScratchHeader*>(PlainRealloc(header, total));
    if (moved == nullptr) return OutOfMemoryErr;
    moved->total = total;
    *cell = moved + 1;
    return 0;
}

}  // namespace tw
