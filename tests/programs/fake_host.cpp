// A program that is its own host: it exports HostNewHandle and the two entries from the main
// module (not gTWRTVersion) and checks that the library binds to them and passes the arguments
// through unchanged, on the first call as on later ones.
#include <dlfcn.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

namespace {
void* g_blocks[16];
int g_count = 0;
}  // namespace

extern "C" {

__attribute__((visibility("default"))) void* HostNewHandle(size_t) { return nullptr; }

__attribute__((visibility("default"))) int32_t HostResizeBlock(int32_t type, int32_t dims, void*** handle,
                                                               int32_t total) {
    std::printf("resize type=%d dims=%d total=%d\n", type, dims, total);
    void* fresh = std::calloc(1, 8 + static_cast<size_t>(total) * 8);
    **handle = fresh;  // the first blocks live on the stack of main
    g_blocks[g_count++] = fresh;
    return 0;
}

__attribute__((visibility("default"))) int32_t HostSetCleanupProc(void (*)(void*), void*, int32_t mode) {
    std::printf("cleanup mode=%d\n", mode);
    return 0;
}
}

int main() {
    const std::string dir = TW_LIB_DIR;
    void* lib = dlopen((dir + "/libtwanlys.so").c_str(), RTLD_NOW | RTLD_LOCAL);
    if (lib == nullptr) return 3;
    auto hist = reinterpret_cast<int32_t (*)(void**, int32_t*, void**, void**, int32_t*)>(
        dlsym(lib, "histgran_head"));
    int32_t x_block[3] = {1, 0, 0};
    const double one = 1.0;
    std::memcpy(&x_block[1], &one, sizeof one);
    int32_t counts_block[1] = {0}, centres_block[1] = {0};
    void* x = x_block;
    void* counts = counts_block;
    void* centres = centres_block;
    for (int32_t bins : {3, 5}) {
        int32_t status = -1;
        hist(&x, &bins, &counts, &centres, &status);
        std::printf("status=%d\n", status);
    }
    for (int i = 0; i < g_count; ++i) std::free(g_blocks[i]);
    return 0;
}
