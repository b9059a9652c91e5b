// The reference host's resize modes: the default keeps the block where it fits and otherwise
// reallocates, keeping the elements; the strict bits move every time and poison added cells.
#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "twrt.hpp"

namespace {

int32_t Resize(twrt::Array1D<double>& a, int32_t n) {
    void** h = a.h();
    const int32_t s = HostResizeBlock(10, 1, &h, n);
    std::memcpy(*h, &n, sizeof n);
    return s;
}

TEST(HostResize, ModesKeepElementsAndPlaceBlocksAsStated) {
    struct Case {
        int32_t mode;
        bool aligned;
    };
    for (const Case c : {Case{0, false}, Case{0, true}, Case{TWRTResizeMove, false},
                         Case{TWRTResizePoison, true}, Case{TWRTResizeMove | TWRTResizePoison, true}}) {
        SCOPED_TRACE(testing::Message() << "mode " << c.mode << " aligned " << c.aligned);
        twrt::ResizeMode mode(c.mode);
        twrt::Placement place(c.aligned);
        twrt::Array1D<double> a(std::vector<double>{1, 2, 3, 4, 5, 6});
        const bool moves = (c.mode & TWRTResizeMove) != 0;

        void* block = *a.h();
        const int64_t allocs = TWRTAllocCount();
        for (int32_t n : {6, 3, 5}) {  // the same size, smaller, and back within the block
            ASSERT_EQ(Resize(a, n), 0);
            EXPECT_EQ(*a.h() == block, !moves) << n;
            block = *a.h();
        }
        EXPECT_EQ(TWRTAllocCount() - allocs, moves ? 3 : 0);
        for (int32_t i = 0; i < 3; ++i) EXPECT_EQ(a[i], i + 1.0);

        ASSERT_EQ(Resize(a, 100000), 0);  // far beyond the block: reallocated
        for (int32_t i = 0; i < 3; ++i) EXPECT_EQ(a[i], i + 1.0);
        const auto at = reinterpret_cast<uintptr_t>(a.data());
        EXPECT_EQ(at % (c.aligned ? 64 : 8), c.aligned ? 0u : 4u);
        if (c.mode & TWRTResizePoison) {
            unsigned char added[8];
            std::memcpy(added, a.data() + 3 * sizeof(double), sizeof added);
            for (unsigned char b : added) EXPECT_EQ(b, kTWRTPoisonByte);
            std::memcpy(added, a.data() + 99999 * sizeof(double), sizeof added);
            for (unsigned char b : added) EXPECT_EQ(b, kTWRTPoisonByte);
        }
    }
}

TEST(HostResize, BlockLimitRefusesLargerRequestsAndKeepsTheBlock) {
    twrt::Array1D<double> a(std::vector<double>{1, 2, 3});
    TWRTSetBlockLimit(4 + 8 * 100);  // dimension word and 100 elements
    EXPECT_EQ(Resize(a, 100), 0);
    void** h = a.h();
    EXPECT_EQ(HostResizeBlock(10, 1, &h, 101), TWRTResizeFailed);
    TWRTSetBlockLimit(0);
    EXPECT_EQ(a[2], 3.0);
    EXPECT_EQ(Resize(a, 101), 0);
}

}  // namespace
