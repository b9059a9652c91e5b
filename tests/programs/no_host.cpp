// Loads the library into a process that is no host and calls an export that needs one.
//   no_host none        no host module at all
//   no_host <library>   a module that is loaded but lacks the entries, named by SetTWRTModule
#include <dlfcn.h>

#include <cstdio>
#include <cstring>
#include <string>

#include "twanlys/types.h"

int main(int argc, char** argv) {
    const std::string dir = TW_LIB_DIR;
    void* lib = dlopen((dir + "/libtwanlys.so").c_str(), RTLD_NOW | RTLD_LOCAL);
    if (lib == nullptr) {
        std::fprintf(stderr, "cannot load: %s\n", dlerror());
        return 3;
    }
    if (argc > 1 && std::strcmp(argv[1], "none") != 0) {
        void* module = dlopen(argv[1], RTLD_NOW | RTLD_LOCAL);
        auto set = reinterpret_cast<void* (*)(void*)>(dlsym(lib, "SetTWRTModule"));
        set(module);
    }
    // A 1-D block with count 0 is enough: the histogram must resize its outputs.
    int32_t x_block[4] = {1, 0, 0, 0};
    const double one = 1.0;
    std::memcpy(&x_block[1], &one, sizeof one);
    int32_t out_block[4] = {0, 0, 0, 0};
    void* x_ptr = x_block;
    void* counts_ptr = out_block;
    void* centres_ptr = out_block;
    int32_t bins = 1, status = 0;
    auto hist = reinterpret_cast<int32_t (*)(void**, int32_t*, void**, void**, int32_t*)>(
        dlsym(lib, "histgran_head"));
    hist(&x_ptr, &bins, &counts_ptr, &centres_ptr, &status);
    std::printf("returned %d\n", status);
    return 0;
}
