// Binding to the host and the link exports.
#include <dlfcn.h>
#include <gtest/gtest.h>

#include "common/helpers.hpp"
#include "twanlys/link.h"
#include "twanlys/stats.h"
#include "twrt.hpp"

namespace {

const std::string kBin = TW_BINARY_DIR;

TEST(Binding, ProcessWithoutHostEndsWithFatalError) {
    std::string out;
    EXPECT_EQ(twtest::Run(kBin + "/tw_no_host none", &out), 1);
    EXPECT_EQ(out, "Fatal Error: tarnwell.lib was not called from a Tarnwell process.\n");
}

TEST(Binding, NamedModuleWithoutTheEntryEndsWithFatalError) {
    // Told to search libm, the library looks nowhere else, though a host is loaded globally.
    std::string out;
    EXPECT_EQ(twtest::Run(kBin + "/tw_no_host libm.so.6 host", &out), 1);
    EXPECT_EQ(out, "Fatal Error: tarnwell.lib could not locate \"HostResizeBlock\".\n");
    // The same process without the module named binds to the global host.
    EXPECT_EQ(twtest::Run(kBin + "/tw_no_host none host", &out), 0);
    EXPECT_EQ(out, "returned 0\n");
}

TEST(Binding, MainModuleExportingHostNewHandleIsTheHost) {
    std::string out;
    ASSERT_EQ(twtest::Run(kBin + "/tw_fake_host", &out), 0) << out;
    // Two calls, each resizing counts (i32) then centres (f64) to the bin count.
    EXPECT_EQ(out,
              "resize type=3 dims=1 total=3\nresize type=10 dims=1 total=3\nstatus=0\n"
              "resize type=3 dims=1 total=5\nresize type=10 dims=1 total=5\nstatus=0\n");
}

TEST(Binding, SetTWRTModuleReturnsWhatItStores) {
    // Naming the module the host already lives in changes nothing for later calls.
    void* host = dlopen("libtwrt.so", RTLD_LAZY | RTLD_NOLOAD);
    ASSERT_NE(host, nullptr);
    EXPECT_EQ(SetTWRTModule(host), host);
    const twrt::Array1D<double> x{1, 2, 3};
    double mean = 0;
    int32_t status = -1;
    Mean_head(x.h(), &mean, &status);
    EXPECT_EQ(mean, 2.0);
    SetTWRTModule(nullptr);
    dlclose(host);
}

TEST(LinkExports, UnreserveOnEmptyCellsIsANoOp) {
    void* cell = nullptr;
    EXPECT_EQ(TransformUnreserveProc(&cell), 0);
    EXPECT_EQ(MeasurementUnreserveProc(&cell), 0);
    EXPECT_EQ(cell, nullptr);
}

TEST(LinkExports, MeasurementUnreserveReleasesTheBinBuffer) {
    // The record a measurement keeps: an i32 size and a pointer to a bin buffer, both heap blocks.
    struct Record {
        int32_t size;
        void* bins;
    };
    auto* record = static_cast<Record*>(std::malloc(sizeof(Record)));
    record->size = 16;
    record->bins = std::malloc(16 * sizeof(double));
    void* cell = record;
    EXPECT_EQ(MeasurementUnreserveProc(&cell), 0);
    EXPECT_EQ(cell, nullptr);  // leaks would show under the sanitizer build
}

}  // namespace
