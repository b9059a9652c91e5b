#include "frame/workspace.hpp"

#include <pthread.h>

#include <atomic>
#include <mutex>

#include "frame/host_link.hpp"
#include "frame/memory.hpp"
#include "frame/status_styles.hpp"
#include "twanlys/workspace.h"

// On 64-bit the rewind and end words of an arena block are pointer-sized, and every block is
// rounded up to a multiple of 16 bytes, so the memory behind a block's 16-byte scratch header is
// 16-byte aligned. The counting, the cursor and the statuses are as on 32-bit.
namespace tw {
namespace {

constexpr uintptr_t kBlockHeader = 2 * sizeof(uintptr_t);  // rewind word, end word
// Room behind limit for the rewind word that a release stores at the end of the top block.
constexpr size_t kTail = 32;

struct Arena {
    std::atomic<int32_t> live{-1};
    std::atomic<uintptr_t> cursor{0};
    uintptr_t base = 0;
    uintptr_t limit = 0;
    std::atomic<uint8_t> enabled{0};
    uintptr_t owner = 0;  // never set: while 0 every thread may allocate
    void* memory = nullptr;
};

Arena g_arena;
std::mutex g_ownerLock;
// The routing state in force from load on: the custom table, filled with the plain entries.
constexpr AllocatorKind kRouting = kAllocCustom;

uintptr_t& Word(uintptr_t address) { return *reinterpret_cast<uintptr_t*>(address); }

uintptr_t LoadWord(uintptr_t address) {
    return std::atomic_ref<uintptr_t>(Word(address)).load(std::memory_order_acquire);
}

void StoreWord(uintptr_t address, uintptr_t value) {
    std::atomic_ref<uintptr_t>(Word(address)).store(value, std::memory_order_release);
}

void Cleanup(void*);

Status Destroy() {
    if (g_arena.live.load() == -1) return 0;
    if (g_arena.live.load() != 0) return WorkspaceInUseErr;
    if (g_arena.enabled.load() != 0) return WorkspaceEnabledErr;
    HostSetCleanup(Cleanup, nullptr, 0);
    g_arena.live.store(-1);
    g_arena.base = g_arena.limit = 0;
    g_arena.cursor.store(0);
    PlainFree(std::exchange(g_arena.memory, nullptr));
    return 0;
}

void Cleanup(void*) {
    g_arena.enabled.store(0);
    g_arena.cursor.store(g_arena.base);
    g_arena.live.store(0);
    Destroy();
}

Status Create(int32_t bytes) {
    if (g_arena.live.load() != -1) return WorkspaceAlreadyInitErr;
    void* memory = PlainAlloc(static_cast<size_t>(bytes) + kTail);
    if (memory == nullptr) return OutOfMemoryErr;
    g_arena.memory = memory;
    g_arena.base = reinterpret_cast<uintptr_t>(memory);
    g_arena.limit = g_arena.base + static_cast<uintptr_t>(bytes);
    g_arena.cursor.store(g_arena.base);
    g_arena.live.store(0);
    HostSetCleanup(Cleanup, nullptr, 1);
    return 0;
}

Status SetEnabled(uint8_t on) {
    if (g_arena.live.load() == -1) {
        Destroy();
        return WorkspaceNotInitErr;
    }
    g_arena.enabled.store(on);
    return 0;
}

// Falls the cursor back to base when the last live block (or reservation) goes.
void DropLive(uintptr_t seen) {
    if (g_arena.live.fetch_sub(1, std::memory_order_acq_rel) == 1)
        g_arena.cursor.compare_exchange_strong(seen, g_arena.base, std::memory_order_acq_rel);
}

}  // namespace

AllocatorKind ScratchRoute() {
    return g_arena.enabled.load(std::memory_order_relaxed) != 0 ? kAllocArena : kRouting;
}

// The live count is taken before the cursor moves, not after: otherwise a release that brings it
// to 0 could rewind the cursor to base under a block that another thread has just carved out but
// not yet counted. A request that fails therefore gives its count back like a release, so an
// arena exhausted while nothing is live recovers at once; with blocks live, the cursor stays at
// limit until they are gone.
void* ArenaAllocate(size_t bytes) {
    {
        std::lock_guard<std::mutex> lock(g_ownerLock);
        const auto self = static_cast<uintptr_t>(pthread_self());
        if (g_arena.owner != 0 && g_arena.owner != self) return nullptr;  // WorkspaceWrongThreadErr
    }
    // A request beyond the whole arena exhausts it like any other that does not fit, without
    // letting the cursor wrap.
    const uintptr_t span = g_arena.limit - g_arena.base;
    const uintptr_t fitted = bytes > span ? span : bytes;
    const uintptr_t size = (kBlockHeader + fitted + 1 + 15) & ~uintptr_t{15};
    g_arena.live.fetch_add(1, std::memory_order_acq_rel);
    const uintptr_t start = g_arena.cursor.fetch_add(size, std::memory_order_acq_rel);
    const uintptr_t end = start + size;
    if (end >= g_arena.limit) {
        // The header is written only once the block is known to fit: with several threads at
        // the top, a failed block may start past limit.
        uintptr_t expected = end;
        g_arena.cursor.compare_exchange_strong(expected, g_arena.limit, std::memory_order_acq_rel);
        DropLive(g_arena.cursor.load(std::memory_order_acquire));
        return nullptr;  // WorkspaceExhaustedErr
    }
    StoreWord(start, start);
    StoreWord(start + sizeof(uintptr_t), end);
    return reinterpret_cast<void*>(start + kBlockHeader);
}

// The top test runs while the block still counts as live, before its rewind address is handed to
// the block behind: then no reset to base and no rewind past this block can have happened, so a
// cursor equal to this block's end really means it is the top block.
void ArenaRelease(void* p) {
    const uintptr_t start = reinterpret_cast<uintptr_t>(p) - kBlockHeader;
    const uintptr_t end = LoadWord(start + sizeof(uintptr_t));
    const uintptr_t rewind = LoadWord(start);
    uintptr_t expected = end;
    if (!g_arena.cursor.compare_exchange_strong(expected, rewind, std::memory_order_acq_rel)) {
        // Not the top: the block behind inherits the rewind address, so released neighbours
        // coalesce, oldest first, without any list.
        std::atomic_ref<uintptr_t>(Word(end)).exchange(rewind, std::memory_order_acq_rel);
    }
    DropLive(g_arena.cursor.load(std::memory_order_acquire));
}

size_t ArenaCapacity(const void* p) {
    const uintptr_t start = reinterpret_cast<uintptr_t>(p) - kBlockHeader;
    return LoadWord(start + sizeof(uintptr_t)) - reinterpret_cast<uintptr_t>(p);
}

ArenaView InspectArena() {
    return {g_arena.live.load(), g_arena.cursor.load(), g_arena.base, g_arena.limit,
            g_arena.enabled.load() != 0};
}

}  // namespace tw

TW_API int32_t InitializeAnalysisWorkspaceH(int32_t bytes, ErrorCluster* error) {
    return tw::ViaCluster(error, [&] {
        if (bytes < 0) return static_cast<tw::Status>(NegativeSizeErr);
        return bytes == 0 ? tw::Destroy() : tw::Create(bytes);
    });
}

TW_API int32_t EnableAnalysisWorkspaceH(ErrorCluster* error) {
    return tw::ViaCluster(error, [] { return tw::SetEnabled(1); });
}

TW_API int32_t DisableAnalysisWorkspaceH(ErrorCluster* error) {
    return tw::ViaCluster(error, [] { return tw::SetEnabled(0); });
}

TW_API int32_t UninitializeAnalysisWorkspaceH(ErrorCluster* error) {
    return tw::ViaCluster(error, [] { return tw::Destroy(); });
}
