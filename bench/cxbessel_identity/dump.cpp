// Usage: dump <libtwanlys.so> <output file> [points]  (see check.sh)
//
// Calls every complex Bessel and Airy export, both scalings and both kinds, at a fixed set of
// pseudo-random points and writes, per call, the status (4 bytes) and the 16 bytes of out. Two
// libraries that compute the same arithmetic write the same file. The library is opened at run
// time so one program serves both sides of the comparison.
#include <dlfcn.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "points.hpp"

namespace {

using points::Cx;
using points::Order;
using points::Point;
using RealFn = int32_t (*)(const double*, const Cx*, const int32_t*, Cx*);
using KindFn = int32_t (*)(const double*, const Cx*, const int32_t*, const int32_t*, Cx*);
using AiryFn = int32_t (*)(const Cx*, const int32_t*, const int32_t*, Cx*);

void* Sym(void* lib, const char* name) {
    void* p = dlsym(lib, name);
    if (p == nullptr) {
        std::fprintf(stderr, "missing %s\n", name);
        std::exit(2);
    }
    return p;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc < 3) {
        std::fprintf(stderr, "usage: %s <libtwanlys.so> <output> [points]\n", argv[0]);
        return 2;
    }
    void* lib = dlopen(argv[1], RTLD_NOW | RTLD_LOCAL);
    if (lib == nullptr) {
        std::fprintf(stderr, "%s\n", dlerror());
        return 2;
    }
    const long points = argc > 3 ? std::atol(argv[3]) : 100000;
    const char* realNames[] = {"TW_CxBesselJr", "TW_CxBesselYr", "TW_CxBesselIr",
                               "TW_CxBesselKr", "TW_CxBesselJs", "TW_CxBesselYs"};
    RealFn real[6];
    for (int i = 0; i < 6; ++i) real[i] = reinterpret_cast<RealFn>(Sym(lib, realNames[i]));
    const KindFn hr = reinterpret_cast<KindFn>(Sym(lib, "TW_CxBesselHr"));
    const KindFn hs = reinterpret_cast<KindFn>(Sym(lib, "TW_CxBesselHs"));
    const AiryFn airy = reinterpret_cast<AiryFn>(Sym(lib, "TW_CxAiry"));

    std::FILE* f = std::fopen(argv[2], "wb");
    if (f == nullptr) return 2;
    std::vector<unsigned char> rec;
    auto put = [&](int32_t s, Cx out) {
        unsigned char b[20];
        std::memcpy(b, &s, 4);
        std::memcpy(b + 4, &out, 16);
        rec.insert(rec.end(), b, b + 20);
    };
    const Cx fill{1.25, -3.5};  // refusals leave out as it was
    for (long p = 0; p < points; ++p) {
        rec.clear();
        const double v = Order();
        const Cx z = Point();
        for (int32_t sc = 0; sc < 2; ++sc) {
            for (RealFn fn : real) {
                Cx out = fill;
                put(fn(&v, &z, &sc, &out), out);
            }
            for (int32_t kind = 0; kind < 2; ++kind) {
                Cx out = fill;
                put(hr(&v, &z, &kind, &sc, &out), out);
                out = fill;
                put(hs(&v, &z, &kind, &sc, &out), out);
            }
            for (int32_t fun = 1; fun <= 4; ++fun) {
                Cx out = fill;
                put(airy(&z, &fun, &sc, &out), out);
            }
        }
        std::fwrite(rec.data(), 1, rec.size(), f);
    }
    std::fclose(f);
    return 0;
}
