// Small helpers shared by the C++ suites.
#pragma once

#include <gtest/gtest.h>

#include <bit>
#include <cstdint>
#include <cstdio>
#include <string>

namespace twtest {

bool WorkspaceMode();

// Names the two block placements of a test parametrised on them.
inline std::string PlacementName(const ::testing::TestParamInfo<bool>& p) {
    return p.param ? "Aligned" : "Packed";
}

inline bool IsFailureNaN(double v) { return std::bit_cast<uint64_t>(v) == 0x7FF8000000000000ull; }

// Runs a shell command; returns its exit status and what it wrote (stdout and stderr).
inline int Run(const std::string& command, std::string* output) {
    FILE* pipe = popen((command + " 2>&1").c_str(), "r");
    if (pipe == nullptr) return -1;
    char buffer[512];
    output->clear();
    while (fgets(buffer, sizeof buffer, pipe) != nullptr) *output += buffer;
    const int status = pclose(pipe);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

}  // namespace twtest
