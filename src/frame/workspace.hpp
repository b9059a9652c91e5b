// The Analysis Workspace: a preallocated arena for scratch memory, shared by all threads.
#pragma once

#include <cstddef>
#include <cstdint>

namespace tw {

// Allocator kinds recorded in a scratch block's header.
enum AllocatorKind : uint64_t {
    kAllocCustom = 1,  // the custom table (plain entries unless replaced)
    kAllocArena = 2,
    kAllocPlain = 3,
};

// Kind for the next scratch allocation: the arena while enabled, else the routing state.
AllocatorKind ScratchRoute();

// Arena entries on whole blocks (the scratch header is part of `bytes`). Null on failure.
void* ArenaAllocate(size_t bytes);
void ArenaRelease(void* p);
// Usable bytes behind p, for the reallocation rule.
size_t ArenaCapacity(const void* p);

// White-box view for tests.
struct ArenaView {
    int32_t live;
    uintptr_t cursor;
    uintptr_t base;
    uintptr_t limit;
    bool enabled;
};
ArenaView InspectArena();

}  // namespace tw
