// Several threads allocating and releasing scratch blocks of varying sizes on one arena.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <random>
#include <thread>
#include <vector>

#include "common/helpers.hpp"
#include "frame/memory.hpp"
#include "frame/workspace.hpp"
#include "twanlys/workspace.h"

namespace {

struct Block {
    unsigned char* p;
    size_t n;
    unsigned char tag;
};

TEST(ArenaStress, LiveBlocksNeverOverlapAndTheArenaReturnsToBase) {
    if (twtest::WorkspaceMode()) GTEST_SKIP() << "the suite's own workspace is in use";
    ErrorCluster e{};
    InitializeAnalysisWorkspaceH(1 << 20, &e);
    EnableAnalysisWorkspaceH(&e);
    ASSERT_EQ(int32_t{e.code}, 0);

    constexpr int kThreads = 6;
    std::atomic<long> corrupt{0}, served{0}, refused{0};
    const auto stop = std::chrono::steady_clock::now() + std::chrono::seconds(2);
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([&, t] {
            std::mt19937 rng(1234u + static_cast<unsigned>(t));
            std::vector<Block> live;
            // Every block is filled with a tag of its own and checked when released: a block
            // handed out twice, or overlapping another, shows up as a wrong byte.
            auto release = [&](size_t i) {
                const Block b = live[i];
                for (size_t k = 0; k < b.n; ++k)
                    if (b.p[k] != b.tag) {
                        ++corrupt;
                        break;
                    }
                tw::ScratchFree(b.p);
                live[i] = live.back();
                live.pop_back();
            };
            unsigned char tag = static_cast<unsigned char>(t * 50);
            while (std::chrono::steady_clock::now() < stop) {
                for (int step = 0; step < 64; ++step) {
                    if (live.size() < 8 && (rng() & 1u)) {
                        // Small equal sizes make blocks line up with earlier cursors, which is
                        // where a reset to base racing a new block would show.
                        const size_t n = (rng() & 1u) ? 1 + rng() % 4000 : 8 * (1 + rng() % 3);
                        auto* p = static_cast<unsigned char*>(tw::ScratchAlloc(n));
                        if (p == nullptr) {
                            ++refused;
                            continue;
                        }
                        ++served;
                        ++tag;
                        std::fill(p, p + n, tag);
                        live.push_back({p, n, tag});
                    } else if (!live.empty()) {
                        release(rng() % live.size());
                    }
                }
                while (!live.empty()) release(live.size() - 1);
            }
        });
    }
    for (auto& th : threads) th.join();

    const tw::ArenaView view = tw::InspectArena();
    EXPECT_EQ(corrupt.load(), 0);
    EXPECT_GT(served.load(), 1000);
    EXPECT_EQ(view.live, 0);
    EXPECT_EQ(view.cursor, view.base);
    DisableAnalysisWorkspaceH(&e);
    UninitializeAnalysisWorkspaceH(&e);
    EXPECT_EQ(int32_t{e.code}, 0);
    std::printf("served %ld blocks, %ld refused for want of room\n", served.load(), refused.load());
}

}  // namespace
