// Usage: bench/fft_identity/check.sh <reference source tree> <reference build> [<build>]  (builds this
// program against the library objects of two build trees and compares what they print)
//
// Prints one 64-bit hash of the exact output bits per length and transform form: real and complex,
// forward and inverse, on plain, interleaved and odd-strided data. Two builds whose kernels compute
// the same arithmetic print the same lines.
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <vector>

#include "transform/fft/fft.hpp"

namespace {

uint64_t Hash(const double* p, size_t n, ptrdiff_t stride) {
    uint64_t h = 1469598103934665603ull;
    for (size_t i = 0; i < n; ++i) {
        uint64_t bits;
        std::memcpy(&bits, p + static_cast<ptrdiff_t>(i) * stride, sizeof bits);
        for (int b = 0; b < 8; ++b) {
            h ^= (bits >> (8 * b)) & 0xff;
            h *= 1099511628211ull;
        }
    }
    return h;
}

std::vector<double> Input(size_t count, uint64_t seed) {
    std::vector<double> v(count);
    uint64_t s = seed * 6364136223846793005ull + 1442695040888963407ull;
    for (double& x : v) {
        s = s * 6364136223846793005ull + 1442695040888963407ull;
        x = static_cast<double>(static_cast<int64_t>(s >> 11) - (int64_t{1} << 52)) / 4503599627370496.0;
    }
    return v;
}

void Real(FftTable* t, int32_t n, ptrdiff_t is, ptrdiff_t os, bool inverse) {
    std::vector<double> in = Input(static_cast<size_t>(n) * is, static_cast<uint64_t>(n));
    std::vector<double> out(static_cast<size_t>(n) * os, 0.0);
    const tw::Status s = inverse ? tw::FftRealInverse(t, in.data(), out.data(), is, os, n)
                                 : tw::FftRealForward(t, in.data(), out.data(), is, os, n);
    std::printf("%d real%s %td %td %d %016llx\n", n, inverse ? "Inv" : "", is, os, s,
                static_cast<unsigned long long>(Hash(out.data(), static_cast<size_t>(n), os)));
}

// Interleaved when gap is 1 and the strides are 2; split halves otherwise.
void Complex(FftTable* t, int32_t n, ptrdiff_t is, ptrdiff_t os, ptrdiff_t gapIn, ptrdiff_t gapOut,
             bool inverse) {
    const size_t nin = static_cast<size_t>(n) * is + static_cast<size_t>(gapIn);
    const size_t nout = static_cast<size_t>(n) * os + static_cast<size_t>(gapOut);
    std::vector<double> in = Input(nin, 7 * static_cast<uint64_t>(n) + 1), out(nout, 0.0);
    const double* ir = in.data();
    double* orr = out.data();
    const tw::Status s = inverse ? tw::FftComplexInverse(t, ir, ir + gapIn, orr, orr + gapOut, is, os, n)
                                 : tw::FftComplexForward(t, ir, ir + gapIn, orr, orr + gapOut, is, os, n);
    std::printf("%d complex%s %td %td %td %d %016llx %016llx\n", n, inverse ? "Inv" : "", is, os, gapIn, s,
                static_cast<unsigned long long>(Hash(orr, static_cast<size_t>(n), os)),
                static_cast<unsigned long long>(Hash(orr + gapOut, static_cast<size_t>(n), os)));
}

void All(int32_t n, bool full) {
    FftTable* t = tw::CreateFftTable(n);
    if (t == nullptr) {
        std::printf("%d no table\n", n);
        return;
    }
    Real(t, n, 1, 1, false);
    Real(t, n, 1, 1, true);
    Complex(t, n, 2, 2, 1, 1, false);
    Complex(t, n, 2, 2, 1, 1, true);
    Complex(t, n, 1, 1, n, n, false);
    if (full) {
        Real(t, n, 3, 2, false);
        Real(t, n, 2, 1, true);
        Complex(t, n, 3, 5, 1, 2, false);
        Complex(t, n, 1, 2, n, 1, true);
    }
    tw::DestroyFftTable(t);
}

}  // namespace

int main() {
    for (int32_t n = 1; n <= 600; ++n) All(n, n <= 200);
    const int32_t more[] = {625,   729,   768,   961,   999,   1000,  1009,  1024,  1331,  1369,   1681,
                            1849,  2048,  2187,  2809,  3125,  4096,  4913,  6859,  8192,  10007,  12167,
                            15015, 16384, 24389, 29791, 32768, 46656, 48000, 65536, 65537, 100000, 1 << 20};
    for (int32_t n : more) All(n, n <= 5000);
    uint64_t s = 12345;
    for (int i = 0; i < 60; ++i) {
        s = s * 6364136223846793005ull + 1442695040888963407ull;
        All(static_cast<int32_t>(601 + (s >> 33) % 60000), false);
    }
    return 0;
}
