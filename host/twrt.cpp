#include "twrt.h"

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <vector>

namespace {

// Every block has a hidden prefix in front of it that records the raw allocation and the block's
// usable size, so blocks can be placed at any offset the placement mode asks for.
struct Prefix {
    void* raw;
    size_t bytes;
    size_t capacity;  // bytes the block may grow to where it stands
    int32_t dims;
    int32_t type;  // type code of the resize that made the block, 0 for a new array
};

std::atomic<int32_t> g_failAt{0};
std::atomic<int64_t> g_resizes{0};
std::atomic<int64_t> g_allocs{0};
std::atomic<int64_t> g_live{0};
std::atomic<int32_t> g_failedTotal{-1};
std::atomic<int32_t> g_aligned{0};
std::atomic<int32_t> g_resizeMode{0};
std::atomic<int64_t> g_blockLimit{0};

constexpr size_t kSlack = 128 + sizeof(Prefix);

// Blocks may start at any 4-byte boundary, so the prefix is copied, never dereferenced in place.
Prefix ReadPrefix(const void* block) {
    Prefix p;
    std::memcpy(&p, static_cast<const unsigned char*>(block) - sizeof(Prefix), sizeof p);
    return p;
}

// Where the block of a raw allocation starts under the current placement.
unsigned char* PlaceBlock(unsigned char* raw, int32_t dims) {
    const size_t header = dims == 2 ? 8 : 4;
    if (g_aligned.load(std::memory_order_relaxed)) {
        auto at = reinterpret_cast<uintptr_t>(raw + sizeof(Prefix) + header + 63) & ~uintptr_t{63};
        return reinterpret_cast<unsigned char*>(at) - header;
    }
    // The block starts 16-aligned, so 1-D element data sit at 4 mod 8.
    auto at = reinterpret_cast<uintptr_t>(raw + sizeof(Prefix) + 15) & ~uintptr_t{15};
    return reinterpret_cast<unsigned char*>(at);
}

void* SetUpBlock(unsigned char* raw, size_t bytes, int32_t dims, int32_t type) {
    unsigned char* block = PlaceBlock(raw, dims);
    const Prefix p{raw, bytes, bytes + kSlack - static_cast<size_t>(block - raw), dims, type};
    std::memcpy(block - sizeof(Prefix), &p, sizeof p);
    g_allocs.fetch_add(1, std::memory_order_relaxed);
    return block;
}

void* AllocBlock(size_t bytes, int32_t dims, int32_t type = 0, bool zeroed = true) {
    void* raw = zeroed ? std::calloc(1, bytes + kSlack) : std::malloc(bytes + kSlack);
    if (raw == nullptr) return nullptr;
    g_live.fetch_add(1, std::memory_order_relaxed);
    return SetUpBlock(static_cast<unsigned char*>(raw), bytes, dims, type);
}

// Grows a block that has no room where it stands, keeping its leading bytes and its placement.
void* ReallocBlock(void* block, size_t bytes, int32_t type) {
    const Prefix old = ReadPrefix(block);
    const size_t offset = static_cast<size_t>(static_cast<unsigned char*>(block) - static_cast<unsigned char*>(old.raw));
    auto* raw = static_cast<unsigned char*>(std::realloc(old.raw, bytes + kSlack));
    if (raw == nullptr) return nullptr;
    unsigned char* moved = PlaceBlock(raw, old.dims);
    if (moved != raw + offset) std::memmove(moved, raw + offset, old.bytes);
    return SetUpBlock(raw, bytes, old.dims, type);
}

void FreeBlock(void* block) {
    if (block == nullptr) return;
    std::free(ReadPrefix(block).raw);
    g_live.fetch_sub(1, std::memory_order_relaxed);
}

struct Cleanup {
    TWRTCleanupProc proc;
    void* record;
    int32_t mode;
};
std::mutex g_cleanupLock;
std::vector<Cleanup> g_cleanups;

}  // namespace

extern "C" {

const int32_t gTWRTVersion = 0x01000000;

int32_t TWRTElementSize(int32_t typeCode) {
    switch (typeCode) {
        case 3: case 7: case 9: return 4;
        case 5: return 1;
        case 10: case 12: return 8;
        case 13: return 16;
        default: return 0;
    }
}

TWRTHandle HostNewHandle(size_t bytes) {
    auto* cell = static_cast<void**>(std::malloc(sizeof(void*)));
    if (cell == nullptr) return nullptr;
    *cell = AllocBlock(bytes < 4 ? 4 : bytes, 1);
    if (*cell == nullptr) {
        std::free(cell);
        return nullptr;
    }
    return cell;
}

TWRTHandle TWRTNewArray(int32_t elementSize, int32_t dims, const int32_t* shape) {
    const size_t header = dims == 2 ? 8 : 4;
    size_t count = 1;
    for (int32_t i = 0; i < dims; ++i) count *= static_cast<size_t>(shape[i] < 0 ? 0 : shape[i]);
    auto* cell = static_cast<void**>(std::malloc(sizeof(void*)));
    if (cell == nullptr) return nullptr;
    *cell = AllocBlock(header + count * static_cast<size_t>(elementSize), dims);
    if (*cell == nullptr) {
        std::free(cell);
        return nullptr;
    }
    std::memcpy(*cell, shape, header);
    return cell;
}

void HostDisposeHandle(TWRTHandle handle) {
    if (handle == nullptr) return;
    FreeBlock(*handle);
    std::free(handle);
}

int32_t HostResizeBlock(int32_t typeCode, int32_t dims, TWRTHandle* handle, int32_t totalElements) {
    g_resizes.fetch_add(1, std::memory_order_relaxed);
    int32_t at = g_failAt.load(std::memory_order_relaxed);
    while (at > 0 && !g_failAt.compare_exchange_weak(at, at - 1, std::memory_order_relaxed)) {
    }
    if (at == 1) {
        g_failedTotal.store(totalElements, std::memory_order_relaxed);
        return TWRTResizeFailed;
    }
    const int32_t elem = TWRTElementSize(typeCode);
    if (handle == nullptr || *handle == nullptr || elem == 0 || (dims != 1 && dims != 2) ||
        totalElements < 0)
        return TWRTResizeFailed;
    const size_t header = dims == 2 ? 8 : 4;
    const size_t bytes = header + static_cast<size_t>(totalElements) * static_cast<size_t>(elem);
    const int64_t limit = g_blockLimit.load(std::memory_order_relaxed);
    if (limit > 0 && bytes > static_cast<size_t>(limit)) return TWRTResizeFailed;
    const int32_t mode = g_resizeMode.load(std::memory_order_relaxed);
    void* old = **handle;
    const Prefix before = old != nullptr ? ReadPrefix(old) : Prefix{};
    void* block = nullptr;
    if (old == nullptr || (mode & TWRTResizeMove)) {
        // A fresh block every time, so that a caller holding a stale element pointer is caught.
        block = AllocBlock(bytes, dims, typeCode, false);
        if (block == nullptr) return TWRTResizeFailed;
        if (old != nullptr) std::memcpy(block, old, std::min(bytes, before.bytes));
        FreeBlock(old);
    } else if (bytes <= before.capacity) {
        block = old;
        Prefix p = before;
        p.bytes = bytes;
        p.type = typeCode;
        std::memcpy(static_cast<unsigned char*>(block) - sizeof(Prefix), &p, sizeof p);
    } else {
        block = ReallocBlock(old, bytes, typeCode);
        if (block == nullptr) return TWRTResizeFailed;
    }
    const size_t kept = std::max(before.bytes, header);
    if ((mode & TWRTResizePoison) && bytes > kept)
        std::memset(static_cast<unsigned char*>(block) + kept, kTWRTPoisonByte, bytes - kept);
    **handle = block;
    return 0;
}

int32_t HostSetCleanupProc(TWRTCleanupProc proc, void* record, int32_t mode) {
    std::lock_guard<std::mutex> lock(g_cleanupLock);
    if (mode == 0) {
        std::erase_if(g_cleanups,
                      [&](const Cleanup& c) { return c.proc == proc && c.record == record; });
    } else {
        g_cleanups.push_back({proc, record, mode});
    }
    return 0;
}

int32_t TWRTRunCleanups(int32_t mode) {
    std::vector<Cleanup> due;
    {
        std::lock_guard<std::mutex> lock(g_cleanupLock);
        auto keep = std::stable_partition(g_cleanups.begin(), g_cleanups.end(), [&](const Cleanup& c) {
            return mode >= 0 && c.mode != mode;
        });
        due.assign(keep, g_cleanups.end());
        g_cleanups.erase(keep, g_cleanups.end());
    }
    for (const Cleanup& c : due) c.proc(c.record);
    return static_cast<int32_t>(due.size());
}

int32_t TWRTCleanupCount(int32_t mode) {
    std::lock_guard<std::mutex> lock(g_cleanupLock);
    int32_t n = 0;
    for (const Cleanup& c : g_cleanups) n += (mode < 0 || c.mode == mode) ? 1 : 0;
    return n;
}

void TWRTFailResizeAt(int32_t n) {
    g_failedTotal.store(-1, std::memory_order_relaxed);
    g_failAt.store(n < 0 ? 0 : n, std::memory_order_relaxed);
}
int32_t TWRTFailedResizeTotal(void) { return g_failedTotal.load(std::memory_order_relaxed); }
int64_t TWRTLiveBlocks(void) { return g_live.load(std::memory_order_relaxed); }
int32_t TWRTBlockInfo(TWRTHandle handle, int32_t* typeCode, int64_t* bytes) {
    if (handle == nullptr || *handle == nullptr) return -1;
    const Prefix p = ReadPrefix(*handle);
    *typeCode = p.type;
    *bytes = static_cast<int64_t>(p.bytes);
    return 0;
}
int64_t TWRTResizeCount(void) { return g_resizes.load(std::memory_order_relaxed); }
int64_t TWRTAllocCount(void) { return g_allocs.load(std::memory_order_relaxed); }
void TWRTSetResizeMode(int32_t mode) { g_resizeMode.store(mode & (TWRTResizeMove | TWRTResizePoison), std::memory_order_relaxed); }
int32_t TWRTResizeMode(void) { return g_resizeMode.load(std::memory_order_relaxed); }
void TWRTSetBlockLimit(int64_t bytes) { g_blockLimit.store(bytes < 0 ? 0 : bytes, std::memory_order_relaxed); }
void TWRTSetPlacement(int32_t aligned) { g_aligned.store(aligned != 0, std::memory_order_relaxed); }
int32_t TWRTPlacement(void) { return g_aligned.load(std::memory_order_relaxed); }

}  // extern "C"
