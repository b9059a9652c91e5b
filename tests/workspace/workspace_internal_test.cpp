// Life cycle of the Analysis Workspace, through its exports and the arena's internal view.
#include <gtest/gtest.h>

#include <vector>

#include "common/helpers.hpp"
#include "frame/memory.hpp"
#include "frame/workspace.hpp"
#include "twanlys/workspace.h"
#include "twrt.hpp"

namespace {

using tw::InspectArena;

int32_t Init(int32_t bytes) {
    ErrorCluster e{};
    InitializeAnalysisWorkspaceH(bytes, &e);
    EXPECT_EQ(e.status, e.code < 0 ? 1 : 0);
    return e.code;
}
template <class Export>
int32_t Call(Export op) {
    ErrorCluster e{};
    op(&e);
    return e.code;
}
int32_t Enable() { return Call(EnableAnalysisWorkspaceH); }
int32_t Disable() { return Call(DisableAnalysisWorkspaceH); }
int32_t Destroy() { return Call(UninitializeAnalysisWorkspaceH); }

class Workspace : public ::testing::Test {
protected:
    void SetUp() override {
        if (twtest::WorkspaceMode()) GTEST_SKIP() << "the suite's own workspace is in use";
    }
    void TearDown() override {
        if (twtest::WorkspaceMode()) return;
        Disable();
        Destroy();
    }
};

TEST_F(Workspace, LifeCycleStatuses) {
    EXPECT_EQ(Enable(), WorkspaceNotInitErr);
    EXPECT_EQ(Disable(), WorkspaceNotInitErr);
    EXPECT_EQ(Init(0), 0);
    EXPECT_EQ(Destroy(), 0);
    EXPECT_EQ(Init(-1), NegativeSizeErr);

    ASSERT_EQ(Init(4096), 0);
    const uintptr_t base = InspectArena().base;
    EXPECT_EQ(Init(8192), WorkspaceAlreadyInitErr);
    EXPECT_EQ(InspectArena().base, base);
    EXPECT_EQ(InspectArena().limit, base + 4096);
    EXPECT_EQ(TWRTCleanupCount(1), 1);

    ASSERT_EQ(Enable(), 0);
    EXPECT_EQ(Destroy(), WorkspaceEnabledErr);
    void* block = tw::ScratchAlloc(100);
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(InspectArena().live, 1);
    EXPECT_EQ(Disable(), 0);
    EXPECT_EQ(Destroy(), WorkspaceInUseErr);
    EXPECT_EQ(Init(0), WorkspaceInUseErr);

    // Released after the routing was switched off, the block still goes back to the arena.
    EXPECT_EQ(tw::ScratchFree(block), 0);
    EXPECT_EQ(InspectArena().live, 0);
    EXPECT_EQ(InspectArena().cursor, base);
    EXPECT_EQ(Destroy(), 0);
    EXPECT_EQ(InspectArena().live, -1);
    EXPECT_EQ(TWRTCleanupCount(1), 0);
}

TEST_F(Workspace, HeapBlockReleasedWhileOnGoesBackToTheHeap) {
    ASSERT_EQ(Init(4096), 0);
    void* heap = tw::ScratchAlloc(64);
    ASSERT_EQ(Enable(), 0);
    void* arena = tw::ScratchAlloc(64);
    const auto view = InspectArena();
    EXPECT_TRUE(reinterpret_cast<uintptr_t>(arena) > view.base &&
                reinterpret_cast<uintptr_t>(arena) < view.limit);
    EXPECT_FALSE(reinterpret_cast<uintptr_t>(heap) >= view.base &&
                 reinterpret_cast<uintptr_t>(heap) < view.limit);
    EXPECT_EQ(tw::ScratchFree(heap), 0);
    EXPECT_EQ(InspectArena().live, 1);
    EXPECT_EQ(tw::ScratchFree(arena), 0);
    EXPECT_EQ(InspectArena().live, 0);
}

TEST_F(Workspace, BlocksAreAlignedAndDisjoint) {
    ASSERT_EQ(Init(1 << 16), 0);
    ASSERT_EQ(Enable(), 0);
    std::vector<char*> blocks;
    for (size_t n : {1, 7, 16, 33, 100, 255}) {
        auto* p = static_cast<char*>(tw::ScratchAlloc(n));
        ASSERT_NE(p, nullptr);
        EXPECT_EQ(reinterpret_cast<uintptr_t>(p) % 16, 0u);
        if (!blocks.empty()) {
            EXPECT_GE(p, blocks.back() + 1);
        }
        std::fill(p, p + n, static_cast<char>(n));
        blocks.push_back(p);
    }
    for (char* p : blocks) EXPECT_EQ(tw::ScratchFree(p), 0);
}

TEST_F(Workspace, ReleaseInAllocationOrderKeepsTheCursorUntilTheLast) {
    ASSERT_EQ(Init(4096), 0);
    ASSERT_EQ(Enable(), 0);
    void* a = tw::ScratchAlloc(40);
    void* b = tw::ScratchAlloc(40);
    void* c = tw::ScratchAlloc(40);
    const uintptr_t top = InspectArena().cursor;
    tw::ScratchFree(a);
    EXPECT_EQ(InspectArena().cursor, top);
    tw::ScratchFree(b);
    EXPECT_EQ(InspectArena().cursor, top);
    tw::ScratchFree(c);
    EXPECT_EQ(InspectArena().cursor, InspectArena().base);
}

TEST_F(Workspace, ReleaseInReverseOrderMovesTheCursorDownStepByStep) {
    ASSERT_EQ(Init(4096), 0);
    ASSERT_EQ(Enable(), 0);
    std::vector<uintptr_t> cursors{InspectArena().cursor};
    std::vector<void*> blocks;
    for (int i = 0; i < 3; ++i) {
        blocks.push_back(tw::ScratchAlloc(24 + 40 * i));
        cursors.push_back(InspectArena().cursor);
    }
    for (int i = 2; i >= 0; --i) {
        tw::ScratchFree(blocks[i]);
        EXPECT_EQ(InspectArena().cursor, cursors[i]);
    }
}

TEST_F(Workspace, ExhaustionFailsUntilEveryBlockIsGone) {
    ASSERT_EQ(Init(1024), 0);
    ASSERT_EQ(Enable(), 0);
    void* kept = nullptr;
    ASSERT_EQ(tw::ScratchAlloc(&kept, 256), 0);
    void* big = nullptr;
    EXPECT_EQ(tw::ScratchAlloc(&big, 2048), OutOfMemoryErr);
    EXPECT_EQ(big, nullptr);
    EXPECT_EQ(InspectArena().cursor, InspectArena().limit);
    void* small = nullptr;
    EXPECT_EQ(tw::ScratchAlloc(&small, 8), OutOfMemoryErr);
    tw::ScratchFree(kept);
    EXPECT_EQ(InspectArena().cursor, InspectArena().base);
    EXPECT_EQ(tw::ScratchAlloc(&small, 8), 0);
    tw::ScratchFree(small);
    // With nothing live, a request that does not fit leaves the arena usable at once.
    EXPECT_EQ(tw::ScratchAlloc(&big, 4096), OutOfMemoryErr);
    EXPECT_EQ(InspectArena().cursor, InspectArena().base);
}

TEST_F(Workspace, ReallocationInPlaceWhenItFits) {
    ASSERT_EQ(Init(4096), 0);
    ASSERT_EQ(Enable(), 0);
    void* p = nullptr;
    ASSERT_EQ(tw::ScratchRealloc(&p, 20), 0);
    void* first = p;
    ASSERT_EQ(tw::ScratchRealloc(&p, 24), 0);  // the rounding left room
    EXPECT_EQ(p, first);
    static_cast<char*>(p)[23] = 9;
    ASSERT_EQ(tw::ScratchRealloc(&p, 500), 0);
    EXPECT_NE(p, first);
    EXPECT_EQ(static_cast<char*>(p)[23], 9);
    EXPECT_EQ(InspectArena().live, 1);
    ASSERT_EQ(tw::ScratchRealloc(&p, 0), 0);
    EXPECT_EQ(InspectArena().live, 0);
}

TEST_F(Workspace, HostCleanupDestroysEvenWithLiveBlocks) {
    ASSERT_EQ(Init(4096), 0);
    ASSERT_EQ(Enable(), 0);
    void* lost = tw::ScratchAlloc(64);
    ASSERT_NE(lost, nullptr);
    EXPECT_EQ(TWRTRunCleanups(1), 1);
    EXPECT_EQ(InspectArena().live, -1);
    EXPECT_FALSE(InspectArena().enabled);
    EXPECT_EQ(Enable(), WorkspaceNotInitErr);
}

}  // namespace
