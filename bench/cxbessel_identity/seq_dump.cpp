// Usage: seq_dump <output file> [points]  (see check.sh; compiled against one tree's port sources)
//
// The exports ask the drivers for one value; the recurrences over sequences of orders behind them
// (forward and backward recurrences, their rescaling, the continuation's remaining terms) only run
// for n > 1. This calls the drivers directly with n = 2..8 at the same kind of points (and at
// larger orders) and writes nz, ierr and every member's bits.
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <vector>

#include "points.hpp"
#include "special/amos/amos.hpp"

using namespace tw::amos;

int main(int argc, char** argv) {
    if (argc < 2) {
        std::fprintf(stderr, "usage: %s <output> [points]\n", argv[0]);
        return 2;
    }
    std::FILE* f = std::fopen(argv[1], "wb");
    if (f == nullptr) return 2;
    const long count = argc > 2 ? std::atol(argv[2]) : 20000;
    constexpr int kMax = 8;
    // The first points as for the exports; a further tenth at orders 100..5000, where members of the
    // uniform expansions' sequences under- and overflow one by one.
    for (long p = 0; p < count + count / 10; ++p) {
        const double v = p < count ? points::Order() : 100.0 * std::pow(50.0, points::Uniform());
        const points::Cx z = points::Point();
        const int n = 2 + static_cast<int>(points::Next() % (kMax - 1));
        for (int kode = 1; kode <= 2; ++kode) {
            for (int fn = 0; fn < 6; ++fn) {
                double yr[kMax], yi[kMax], wr[kMax], wi[kMax];
                for (int i = 0; i < kMax; ++i) yr[i] = yi[i] = wr[i] = wi[i] = -7.25;
                int nz = -99, ierr = -99;
                switch (fn) {
                    case 0:
                        zbesj(z.re, z.im, v, kode, n, yr, yi, &nz, &ierr);
                        break;
                    case 1:
                        zbesy(z.re, z.im, v, kode, n, yr, yi, &nz, wr, wi, &ierr);
                        break;
                    case 2:
                        zbesi(z.re, z.im, v, kode, n, yr, yi, &nz, &ierr);
                        break;
                    case 3:
                        zbesk(z.re, z.im, v, kode, n, yr, yi, &nz, &ierr);
                        break;
                    case 4:
                        zbesh(z.re, z.im, v, kode, 1, n, yr, yi, &nz, &ierr);
                        break;
                    default:
                        zbesh(z.re, z.im, v, kode, 2, n, yr, yi, &nz, &ierr);
                        break;
                }
                std::fwrite(&nz, sizeof nz, 1, f);
                std::fwrite(&ierr, sizeof ierr, 1, f);
                std::fwrite(yr, sizeof(double), kMax, f);
                std::fwrite(yi, sizeof(double), kMax, f);
            }
        }
    }
    std::fclose(f);
    return 0;
}
