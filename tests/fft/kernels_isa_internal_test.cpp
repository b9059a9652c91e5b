// The kernels of every instruction set compute the same bits: each form of each codelet radix,
// run through the baseline tables and through the widest ones on random data, with interleaved,
// split, unit and odd strides and counts that leave remainders for the narrower lanes.
#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <vector>

#include "transform/fft/kernels/codelets.hpp"

namespace {

using tw::fft::CodeletIsa;
using tw::fft::CodeletTables;

std::vector<double> Random(size_t n, std::mt19937_64& g) {
    std::uniform_real_distribution<double> u(-1.0, 1.0);
    std::vector<double> v(n);
    for (double& x : v) x = u(g);
    return v;
}

bool Same(const std::vector<double>& a, const std::vector<double>& b) {
    return a.size() == b.size() && std::memcmp(a.data(), b.data(), a.size() * sizeof(double)) == 0;
}

class KernelIsa : public ::testing::Test {
protected:
    void SetUp() override {
        wide_ = tw::fft::CodeletsFor(CodeletIsa::Avx2);
        if (wide_ == nullptr) GTEST_SKIP() << "no AVX2 on this processor";
    }
    const CodeletTables& base_ = *tw::fft::CodeletsFor(CodeletIsa::Sse2);
    const CodeletTables* wide_ = nullptr;
    std::mt19937_64 gen_{20240607};
};

constexpr int32_t kCounts[] = {1, 2, 3, 4, 5, 6, 7, 9, 13};

TEST_F(KernelIsa, RealLeaves) {
    struct Strides { ptrdiff_t in, out; };
    for (int32_t r = 2; r <= tw::kFftMaxRadix; ++r) {
        if (base_.leafReal[r] == nullptr) continue;
        for (const int32_t count : kCounts) {
            for (const Strides st : {Strides{1, 1}, Strides{3, 2}}) {
                const size_t n = static_cast<size_t>(r) * count;
                const std::vector<double> in = Random(n * st.in, gen_);
                std::vector<double> a(n * st.out, 0.0), b = a;
                base_.leafReal[r](in.data(), a.data(), st.in, st.out, count);
                wide_->leafReal[r](in.data(), b.data(), st.in, st.out, count);
                EXPECT_TRUE(Same(a, b)) << "radix " << r << " count " << count << " stride " << st.in;
            }
        }
    }
}

// Complex data either interleaved (one f64 apart, stride 2) or split (halves of one block).
TEST_F(KernelIsa, ComplexLeaves) {
    struct Layout { bool interleaved; ptrdiff_t in, out; };
    for (int32_t r = 2; r <= tw::kFftMaxRadix; ++r) {
        if (base_.leafComplex[r] == nullptr) continue;
        for (const int32_t count : kCounts) {
            for (const Layout l : {Layout{true, 2, 2}, Layout{true, 6, 4}, Layout{false, 1, 1}, Layout{false, 3, 2}}) {
                const size_t n = static_cast<size_t>(r) * count;
                const size_t halfIn = n * l.in, halfOut = n * l.out;
                const std::vector<double> in = Random(2 * halfIn, gen_);
                std::vector<double> a(2 * halfOut, 0.0), b = a;
                const ptrdiff_t gi = l.interleaved ? 1 : static_cast<ptrdiff_t>(halfIn);
                const ptrdiff_t go = l.interleaved ? 1 : static_cast<ptrdiff_t>(halfOut);
                base_.leafComplex[r](in.data(), in.data() + gi, a.data(), a.data() + go, l.in, l.out, count);
                wide_->leafComplex[r](in.data(), in.data() + gi, b.data(), b.data() + go, l.in, l.out, count);
                EXPECT_TRUE(Same(a, b)) << "radix " << r << " count " << count << " interleaved " << l.interleaved
                                        << " stride " << l.in;
            }
        }
    }
}

TEST_F(KernelIsa, RealCombines) {
    for (int32_t r = 2; r <= tw::kFftMaxRadix; ++r) {
        if (base_.combineReal[r] == nullptr) continue;
        for (const int32_t m : {1, 2, 3, 4, 5, 8, 9, 12, 17}) {
            for (const ptrdiff_t s : {1, 3}) {
                const std::vector<double> twRe = Random(static_cast<size_t>(r - 1) * (m - 1) + 1, gen_);
                const std::vector<double> twIm = Random(twRe.size(), gen_);
                const std::vector<double> data = Random(static_cast<size_t>(r) * m * s, gen_);
                std::vector<double> a = data, b = data;
                base_.combineReal[r](a.data(), twRe.data(), twIm.data(), s, m);
                wide_->combineReal[r](b.data(), twRe.data(), twIm.data(), s, m);
                EXPECT_TRUE(Same(a, b)) << "radix " << r << " m " << m << " stride " << s;
            }
        }
    }
}

TEST_F(KernelIsa, ComplexCombines) {
    struct Layout { bool interleaved; ptrdiff_t s; };
    for (int32_t r = 2; r <= tw::kFftMaxRadix; ++r) {
        if (base_.combineComplex[r] == nullptr) continue;
        for (const int32_t m : {1, 2, 3, 4, 5, 6, 8, 9, 12, 17}) {
            for (const Layout l : {Layout{true, 2}, Layout{true, 6}, Layout{false, 1}, Layout{false, 3}}) {
                const std::vector<double> twRe = Random(static_cast<size_t>(r - 1) * (m - 1) + 1, gen_);
                const std::vector<double> twIm = Random(twRe.size(), gen_);
                const size_t half = static_cast<size_t>(r) * m * l.s;
                const std::vector<double> data = Random(2 * half, gen_);
                const ptrdiff_t gap = l.interleaved ? 1 : static_cast<ptrdiff_t>(half);
                std::vector<double> a = data, b = data;
                base_.combineComplex[r](a.data(), a.data() + gap, twRe.data(), twIm.data(), l.s, m);
                wide_->combineComplex[r](b.data(), b.data() + gap, twRe.data(), twIm.data(), l.s, m);
                EXPECT_TRUE(Same(a, b)) << "radix " << r << " m " << m << " interleaved " << l.interleaved
                                        << " stride " << l.s;
            }
        }
    }
}

// Combines side by side: the lanes across a group give each member the bits of its own combine,
// in both instruction sets; 5 members leave one to run alone, and split data run one by one.
TEST_F(KernelIsa, ComplexCombinesSideBySide) {
    const int32_t group = 5;
    for (int32_t r = 2; r <= tw::kFftMaxRadix; ++r) {
        if (base_.combineComplex[r] == nullptr) continue;
        for (const int32_t m : {1, 3, 13}) {
            for (const bool interleaved : {true, false}) {
                const std::vector<double> twRe = Random(static_cast<size_t>(r - 1) * (m - 1) + 1, gen_);
                const std::vector<double> twIm = Random(twRe.size(), gen_);
                const ptrdiff_t s = interleaved ? 2 : 1, lane = 2 * static_cast<ptrdiff_t>(r) * m + 6;
                const size_t half = static_cast<size_t>(lane) * group;
                const ptrdiff_t gap = interleaved ? 1 : static_cast<ptrdiff_t>(half);
                const std::vector<double> data = Random(2 * half, gen_);
                std::vector<double> one = data, a = data, b = data;
                for (int32_t g = 0; g < group; ++g)
                    base_.combineComplex[r](one.data() + g * lane, one.data() + g * lane + gap, twRe.data(),
                                            twIm.data(), s, m);
                base_.combineComplexLanes[r](a.data(), a.data() + gap, twRe.data(), twIm.data(), s, m, group, lane);
                wide_->combineComplexLanes[r](b.data(), b.data() + gap, twRe.data(), twIm.data(), s, m, group, lane);
                EXPECT_TRUE(Same(one, a) && Same(one, b)) << "radix " << r << " m " << m << " interleaved "
                                                          << interleaved;
            }
        }
    }
}

TEST_F(KernelIsa, RealCombinesSideBySide) {
    const int32_t group = 5;
    for (int32_t r = 2; r <= tw::kFftMaxRadix; ++r) {
        if (base_.combineReal[r] == nullptr) continue;
        for (const int32_t m : {1, 2, 3, 12, 13}) {
            for (const ptrdiff_t s : {1, 3}) {
                const std::vector<double> twRe = Random(static_cast<size_t>(r - 1) * (m - 1) + 1, gen_);
                const std::vector<double> twIm = Random(twRe.size(), gen_);
                const ptrdiff_t lane = static_cast<ptrdiff_t>(r) * m * s + 5;
                const std::vector<double> data = Random(static_cast<size_t>(lane) * group, gen_);
                std::vector<double> one = data, a = data, b = data;
                for (int32_t g = 0; g < group; ++g)
                    base_.combineReal[r](one.data() + g * lane, twRe.data(), twIm.data(), s, m);
                base_.combineRealLanes[r](a.data(), twRe.data(), twIm.data(), s, m, group, lane);
                wide_->combineRealLanes[r](b.data(), twRe.data(), twIm.data(), s, m, group, lane);
                EXPECT_TRUE(Same(one, a) && Same(one, b)) << "radix " << r << " m " << m << " stride " << s;
            }
        }
    }
}

}  // namespace
