// Test entry for every C++ suite. With TW_TEST_WORKSPACE=<bytes> set, the whole suite runs with
// scratch memory served by the Analysis Workspace, and the arena must be empty at the end.
// The reference host runs in its strict resize mode: every resize moves the block (stale element
// pointers fault under the sanitizers) and fills the cells it adds with poison (a library that
// reads cells it never wrote gets huge values, not zeros). Tests of the default mode select it.
#include <gtest/gtest.h>

#include <cstdlib>

#include "twanlys/workspace.h"
#include "twrt.h"

namespace {

class WorkspaceEnvironment : public ::testing::Environment {
public:
    explicit WorkspaceEnvironment(int32_t bytes) : bytes_(bytes) {}
    void SetUp() override {
        ErrorCluster e{};
        InitializeAnalysisWorkspaceH(bytes_, &e);
        EnableAnalysisWorkspaceH(&e);
        ASSERT_EQ(int32_t{e.code}, 0) << "the workspace could not be set up";
    }
    void TearDown() override {
        ErrorCluster e{};
        DisableAnalysisWorkspaceH(&e);
        UninitializeAnalysisWorkspaceH(&e);
        EXPECT_EQ(int32_t{e.code}, 0) << "scratch blocks left live in the workspace";
    }

private:
    int32_t bytes_;
};

}  // namespace

namespace twtest {
bool WorkspaceMode() { return std::getenv("TW_TEST_WORKSPACE") != nullptr; }
}  // namespace twtest

int main(int argc, char** argv) {
    ::testing::InitGoogleTest(&argc, argv);
    TWRTSetResizeMode(TWRTResizeMove | TWRTResizePoison);
    if (const char* bytes = std::getenv("TW_TEST_WORKSPACE"))
        ::testing::AddGlobalTestEnvironment(new WorkspaceEnvironment(std::atoi(bytes)));
    return RUN_ALL_TESTS();
}
