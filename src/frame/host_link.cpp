#include "frame/host_link.hpp"

#include <dlfcn.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "twanlys/link.h"

namespace tw {
namespace {

// One record per entry: the address once found, and the name it is found by.
struct EntrySlot {
    std::atomic<void*> address;
    const char* name;
};

EntrySlot g_resizeSlot{nullptr, "HostResizeBlock"};
EntrySlot g_cleanupSlot{nullptr, "HostSetCleanupProc"};
std::atomic<void*> g_hostModule{nullptr};

[[noreturn]] void Fatal(const std::string& text) {
    std::fprintf(stderr, "Fatal Error: %s\n", text.c_str());
    std::fflush(stderr);
    std::exit(1);
}

// The module is searched afresh at every binding; only entry addresses are kept.
void* FindHostModule() {
    if (void* chosen = g_hostModule.load(std::memory_order_acquire)) return chosen;
    void* module = dlopen(nullptr, RTLD_LAZY);
    if (module != nullptr && dlsym(module, "gTWRTVersion") == nullptr &&
        dlsym(module, "HostNewHandle") == nullptr)
        module = dlopen("libtwrt.so", RTLD_LAZY | RTLD_NOLOAD);
    if (module == nullptr) module = dlopen("libtwffrt.so", RTLD_LAZY | RTLD_NOLOAD);
    return module;
}

void* Bind(EntrySlot& slot) {
    void* module = FindHostModule();
    if (module == nullptr) Fatal("tarnwell.lib was not called from a Tarnwell process.");
    void* address = slot.address.load(std::memory_order_acquire);
    if (address == nullptr) {
        address = dlsym(module, slot.name);
        // Two threads may race here; both store the same address.
        slot.address.store(address, std::memory_order_release);
    }
    if (address == nullptr) Fatal(std::string("tarnwell.lib could not locate \"") + slot.name + "\".");
    return address;
}

template <class Fn>
Fn Entry(EntrySlot& slot) {
    void* address = slot.address.load(std::memory_order_acquire);
    if (address == nullptr) address = Bind(slot);
    return reinterpret_cast<Fn>(address);
}

}  // namespace

int32_t HostResize(int32_t typeCode, int32_t dims, NumericHandle* handle, int32_t totalElements) {
    using Fn = int32_t (*)(int32_t, int32_t, NumericHandle*, int32_t);
    return Entry<Fn>(g_resizeSlot)(typeCode, dims, handle, totalElements);
}

int32_t HostSetCleanup(HostCleanupProc proc, void* record, int32_t mode) {
    using Fn = int32_t (*)(HostCleanupProc, void*, int32_t);
    return Entry<Fn>(g_cleanupSlot)(proc, record, mode);
}

}  // namespace tw

TW_API void* SetTWRTModule(void* module) {
    tw::g_hostModule.store(module, std::memory_order_release);
    return module;
}
