// Every built export, called with hostile arguments made from its row of the signature table and
// judged by the shared contract; the library exports exactly the built rows.
#include <gtest/gtest.h>

#include <chrono>
#include <cstdlib>
#include <set>
#include <sstream>
#include <thread>

#include "common/helpers.hpp"
#include <cstdlib>
#include <cstring>

#include "sweep/runner.hpp"
// The table brings the public headers; the header check of the same rows is export_check.cpp.
#include "export_table.inc"

namespace {

const std::vector<const sweep::Row*>& Built() {
    static const std::vector<const sweep::Row*> rows = [] {
        // TW_SWEEP_ROW=Name sweeps that row alone (the link check then reports the others).
        const char* only = std::getenv("TW_SWEEP_ROW");
        std::vector<const sweep::Row*> v;
        for (const sweep::Row& r : kExportRows)
            if (only == nullptr || std::strcmp(only, r.name) == 0) v.push_back(&r);
        return v;
    }();
    return rows;
}

TEST(Sweep, EveryBuiltExportKeepsTheSharedContract) {
    const auto start = std::chrono::steady_clock::now();
    sweep::Tally tally;
    for (const sweep::Row* row : Built()) {
        const std::vector<std::string> faults = sweep::SweepRow(*row, sweep::Depth(), &tally);
        for (size_t k = 0; k < faults.size() && k < 5; ++k) ADD_FAILURE() << faults[k];
        if (faults.size() > 5) ADD_FAILURE() << row->name << ": " << faults.size() - 5 << " more faults";
    }
    const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    std::printf("sweep: %lld calls (%lld failed) over %d exports (%d not swept, %d without a status set) in %.1f s\n",
                static_cast<long long>(tally.calls), static_cast<long long>(tally.failed), tally.rows, tally.skipped,
                tally.unlisted, seconds);
    EXPECT_GT(tally.rows, 200);
}

TEST(Sweep, EightThreadsGiveTheBitsOfOne) {
    const std::vector<std::string> faults = sweep::CompareThreads(Built(), 8);
    for (size_t k = 0; k < faults.size() && k < 10; ++k) ADD_FAILURE() << faults[k];
}

TEST(Sweep, LibraryExportsExactlyTheBuiltRows) {
    std::string nm;
    ASSERT_EQ(twtest::Run("nm -D --defined-only " TW_BINARY_DIR "/libtwanlys.so", &nm), 0) << nm;
    std::set<std::string> built;
    for (const sweep::Row* row : Built()) built.insert(row->name);
    for (const std::string& fault : sweep::CompareExports(built, nm)) ADD_FAILURE() << fault;
}

}  // namespace
