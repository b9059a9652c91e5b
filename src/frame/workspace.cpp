#include "frame/workspace.hpp"

#include <pthread.h>

#include <algorithm>
#include <atomic>
#include <mutex>
#include <utility>

#include "frame/host_link.hpp"
#include "frame/memory.hpp"
#include "frame/status_styles.hpp"
#include "twanlys/workspace.h"

// On 64-bit the rewind and end words of an arena block are pointer-sized, and every block is
// rounded up to a multiple of 16 bytes, so the memory behind a block's 16-byte scratch header is
// 16-byte aligned.
//
// The live count and the cursor share one 64-bit atomic word (count in the high half, cursor as
// an offset from base in the low half). With two separate words, a release that brings the count
// to 0 and then moves the cursor back to base can do so under a block that another thread carved
// out in between; in one word the last release and the reset are a single compare-and-exchange,
// and an allocation moves the cursor and counts its block at once. The exhaustion rules, the
// coalescing by rewind words and the statuses are unchanged.
namespace tw {
namespace {

constexpr uintptr_t kBlockHeader = 2 * sizeof(uintptr_t);  // rewind word, end word
// Room behind limit for the rewind word that a release stores at the end of the top block.
constexpr size_t kTail = 32;
constexpr int32_t kAbsent = -1;

struct State {
    int32_t live;
    uint32_t offset;  // cursor - base
};

constexpr uint64_t Pack(State s) {
    return (uint64_t{static_cast<uint32_t>(s.live)} << 32) | s.offset;
}
constexpr State Unpack(uint64_t w) {
    return {static_cast<int32_t>(static_cast<uint32_t>(w >> 32)), static_cast<uint32_t>(w)};
}

struct Arena {
    std::atomic<uint64_t> state{Pack({kAbsent, 0})};
    uintptr_t base = 0;
    uintptr_t limit = 0;
    std::atomic<uint8_t> enabled{0};
    uintptr_t owner = 0;  // never set: while 0 every thread may allocate
    void* memory = nullptr;

    int32_t Live() const { return Unpack(state.load()).live; }
    uint32_t Span() const { return static_cast<uint32_t>(limit - base); }
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
    const int32_t live = g_arena.Live();
    if (live == kAbsent) return 0;
    if (live != 0) return WorkspaceInUseErr;
    if (g_arena.enabled.load() != 0) return WorkspaceEnabledErr;
    HostSetCleanup(Cleanup, nullptr, 0);
    g_arena.state.store(Pack({kAbsent, 0}));
    g_arena.base = g_arena.limit = 0;
    PlainFree(std::exchange(g_arena.memory, nullptr));
    return 0;
}

void Cleanup(void*) {
    g_arena.enabled.store(0);
    g_arena.state.store(Pack({0, 0}));  // whatever is live is gone
    Destroy();
}

Status Create(int32_t bytes) {
    if (g_arena.Live() != kAbsent) return WorkspaceAlreadyInitErr;
    void* memory = PlainAlloc(static_cast<size_t>(bytes) + kTail);
    if (memory == nullptr) return OutOfMemoryErr;
    g_arena.memory = memory;
    g_arena.base = reinterpret_cast<uintptr_t>(memory);
    g_arena.limit = g_arena.base + static_cast<uintptr_t>(bytes);
    g_arena.state.store(Pack({0, 0}));
    HostSetCleanup(Cleanup, nullptr, 1);
    return 0;
}

Status SetEnabled(uint8_t on) {
    if (g_arena.Live() == kAbsent) {
        Destroy();
        return WorkspaceNotInitErr;
    }
    g_arena.enabled.store(on);
    return 0;
}

}  // namespace

AllocatorKind ScratchRoute() {
    return g_arena.enabled.load(std::memory_order_relaxed) != 0 ? kAllocArena : kRouting;
}

void* ArenaAllocate(size_t bytes) {
    {
        std::lock_guard<std::mutex> lock(g_ownerLock);
        const auto self = static_cast<uintptr_t>(pthread_self());
        if (g_arena.owner != 0 && g_arena.owner != self) return nullptr;  // WorkspaceWrongThreadErr
    }
    const uint64_t span = g_arena.Span();
    const uint64_t size = (kBlockHeader + std::min<uint64_t>(bytes, span) + 1 + 15) & ~uint64_t{15};
    uint64_t seen = g_arena.state.load(std::memory_order_acquire);
    for (;;) {
        const State s = Unpack(seen);
        const uint64_t end = s.offset + size;
        if (end >= span) {
            // Exhausted: with blocks live the cursor stands at limit until they are gone. With
            // none live the request alone is too large, and the arena stays as it is.
            if (s.live == 0 || s.offset == span ||
                g_arena.state.compare_exchange_weak(seen, Pack({s.live, static_cast<uint32_t>(span)}),
                                                    std::memory_order_acq_rel))
                return nullptr;  // WorkspaceExhaustedErr
            continue;
        }
        if (g_arena.state.compare_exchange_weak(seen, Pack({s.live + 1, static_cast<uint32_t>(end)}),
                                                std::memory_order_acq_rel))
            break;
    }
    const uintptr_t start = g_arena.base + Unpack(seen).offset;
    StoreWord(start, start);
    StoreWord(start + sizeof(uintptr_t), start + size);
    return reinterpret_cast<void*>(start + kBlockHeader);
}

// A release at the top drops the count and moves the cursor back past this block and the released
// run below it in one compare-and-exchange; the last release moves it to base. Below the top, the
// block behind inherits the rewind address first and the count drops after, so the inherited word
// is never memory that a reset has handed to someone else. Such a block does not rewind even if
// it becomes the top meanwhile: its rewind address has been passed on, and the cursor may since
// have fallen below it and come back to its end under new blocks.
void ArenaRelease(void* p) {
    const uintptr_t start = reinterpret_cast<uintptr_t>(p) - kBlockHeader;
    const uintptr_t end = LoadWord(start + sizeof(uintptr_t));
    const uintptr_t rewind = LoadWord(start);
    const auto endOffset = static_cast<uint32_t>(end - g_arena.base);
    const auto rewindOffset = static_cast<uint32_t>(rewind - g_arena.base);
    uint64_t seen = g_arena.state.load(std::memory_order_acquire);
    for (State s = Unpack(seen); s.live == 1 || s.offset == endOffset; s = Unpack(seen)) {
        const State next = s.live == 1 ? State{0, 0} : State{s.live - 1, rewindOffset};
        if (g_arena.state.compare_exchange_weak(seen, Pack(next), std::memory_order_acq_rel)) return;
    }
    std::atomic_ref<uintptr_t>(Word(end)).exchange(rewind, std::memory_order_acq_rel);
    seen = g_arena.state.load(std::memory_order_acquire);
    for (;;) {
        const State s = Unpack(seen);
        const State next = s.live == 1 ? State{0, 0} : State{s.live - 1, s.offset};
        if (g_arena.state.compare_exchange_weak(seen, Pack(next), std::memory_order_acq_rel)) return;
    }
}

size_t ArenaCapacity(const void* p) {
    const uintptr_t start = reinterpret_cast<uintptr_t>(p) - kBlockHeader;
    return LoadWord(start + sizeof(uintptr_t)) - reinterpret_cast<uintptr_t>(p);
}

ArenaView InspectArena() {
    const State s = Unpack(g_arena.state.load());
    const uintptr_t cursor = s.live == kAbsent ? 0 : g_arena.base + s.offset;
    return {s.live, cursor, g_arena.base, g_arena.limit, g_arena.enabled.load() != 0};
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
