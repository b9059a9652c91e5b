// Loads the library into a process that is no host and calls an export that needs one.
//   no_host none        no host module at all
//   no_host <library>   a module that is loaded but lacks the entries, named by SetTWRTModule
//   a second argument "host" loads the reference host globally first
#include <dlfcn.h>

#include <cstdio>
#include <cstring>
#include <string>

namespace {

using NewArray = void** (*)(int32_t, int32_t, const int32_t*);
using Dispose = void (*)(void**);

}  // namespace

int main(int argc, char** argv) {
    const std::string dir = TW_LIB_DIR;
    void* host = nullptr;
    if (argc > 2 && std::strcmp(argv[2], "host") == 0) {
        host = dlopen((dir + "/libtwrt.so").c_str(), RTLD_NOW | RTLD_GLOBAL);
        if (host == nullptr) return 3;
    }
    void* lib = dlopen((dir + "/libtwanlys.so").c_str(), RTLD_NOW | RTLD_LOCAL);
    if (lib == nullptr) {
        std::fprintf(stderr, "cannot load: %s\n", dlerror());
        return 3;
    }
    if (std::strcmp(argv[1], "none") != 0) {
        auto set = reinterpret_cast<void* (*)(void*)>(dlsym(lib, "SetTWRTModule"));
        set(dlopen(argv[1], RTLD_NOW | RTLD_LOCAL));
    }
    // One sample and one bin: the histogram must resize its two outputs through the host.
    int32_t x_block[3] = {1, 0, 0}, out_block[1] = {0};
    const double one = 1.0;
    std::memcpy(&x_block[1], &one, sizeof one);
    void* x_cell = x_block;
    void* counts_cell = out_block;
    void* centres_cell = out_block;
    void** x = &x_cell;
    void** counts = &counts_cell;
    void** centres = &centres_cell;
    if (host != nullptr) {
        auto make = reinterpret_cast<NewArray>(dlsym(host, "TWRTNewArray"));
        const int32_t empty[1] = {0};
        counts = make(4, 1, empty);
        centres = make(8, 1, empty);
    }
    int32_t bins = 1, status = -1;
    auto hist = reinterpret_cast<int32_t (*)(void**, int32_t*, void**, void**, int32_t*)>(
        dlsym(lib, "histgran_head"));
    hist(x, &bins, counts, centres, &status);
    std::printf("returned %d\n", status);
    if (host != nullptr) {
        auto dispose = reinterpret_cast<Dispose>(dlsym(host, "HostDisposeHandle"));
        dispose(counts);
        dispose(centres);
    }
    return 0;
}
