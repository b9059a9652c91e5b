// The compiled coefficient tables against the collected figures they were generated from. The data
// file lives outside the project (beside a checkout, in shared/data/); without it the test skips.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <limits>
#include <sstream>
#include <string>

#include "special/bessel_tables.hpp"
#include "special/special2_tables.hpp"

namespace {

namespace fs = std::filesystem;

fs::path FindData() {
    if (const char* env = std::getenv("TWANLYS_TABLE_DATA")) return env;
    for (fs::path dir = fs::path(TW_SOURCE_DIR); !dir.empty(); dir = dir.parent_path()) {
        const fs::path candidate = dir / "shared" / "data" / "cephes-tables.json";
        if (fs::exists(candidate)) return candidate;
        if (dir == dir.root_path()) break;
    }
    return {};
}

// The text of a routine's object: from its top-level key to the next top-level key.
std::string Quoted(const char* prefix, const char* name, const char* suffix) {
    std::string s(prefix);
    s.append(name);
    s.append(suffix);
    return s;
}

std::string RoutineText(const std::string& json, const char* routine) {
    const std::string key = Quoted("\n \"", routine, "\": {");
    const size_t start = json.find(key);
    if (start == std::string::npos) return {};
    const size_t end = json.find("\n \"", start + key.size());
    return json.substr(start, end == std::string::npos ? std::string::npos : end - start);
}

// Skip marks an index the generator does not take from the file (-1: none).
template <class Entry>
int SkipOf(const Entry&) {
    return -1;
}
int SkipOf(const tw::cephes::OtherTableEntry& e) { return e.skip; }

// Every compiled figure equals the file's; counts the figures compared.
template <class Entries>
void CheckAgainstFile(const Entries& entries, int& checked) {
    const fs::path path = FindData();
    std::ifstream in(path);
    std::stringstream buffer;
    buffer << in.rdbuf();
    const std::string json = buffer.str();
    for (const auto& e : entries) {
        const std::string text = RoutineText(json, e.routine);
        ASSERT_FALSE(text.empty()) << e.routine;
        const std::string what = Quoted(e.routine, ".", e.name);
        size_t at = text.find(Quoted("\"", e.name, e.count > 0 ? "\": [" : "\": \""));
        ASSERT_NE(at, std::string::npos) << what;
        at += std::strlen(e.name) + 4;
        int index = 0;
        while (true) {
            const size_t open = text.find('"', at);
            if (e.count > 0 && text.find(']', at) < open) break;
            const size_t close = text.find('"', open + 1);
            const double figure = std::strtod(text.substr(open + 1, close - open - 1).c_str(), nullptr);
            ASSERT_LT(index, e.count > 0 ? e.count : 1) << what << " has more figures in the file";
            if (index != SkipOf(e)) {
                EXPECT_EQ(e.values[index], figure) << what << "[" << index << "]";
            }
            ++index;
            ++checked;
            at = close + 1;
            if (e.count == 0) break;
        }
        EXPECT_EQ(index, e.count > 0 ? e.count : 1) << what;
    }
}

TEST(BesselTables, EqualTheCollectedFigures) {
    if (FindData().empty() || !fs::exists(FindData()))
        GTEST_SKIP() << "no cephes-tables.json beside the checkout";
    int checked = 0;
    CheckAgainstFile(tw::cephes::kTables, checked);
    EXPECT_GT(checked, 300);
}

TEST(OtherSpecialTables, EqualTheCollectedFigures) {
    if (FindData().empty() || !fs::exists(FindData()))
        GTEST_SKIP() << "no cephes-tables.json beside the checkout";
    int checked = 0;
    CheckAgainstFile(tw::cephes::kOtherTables, checked);
    EXPECT_GT(checked, 250);
    // The pole of zeta at 1 stands in the table as infinity, not as the file's machine limit.
    EXPECT_EQ(tw::cephes::zetac::azetac[1], std::numeric_limits<double>::infinity());
}

}  // namespace
