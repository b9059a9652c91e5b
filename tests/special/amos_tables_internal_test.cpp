// The compiled DATA tables of the complex Bessel routines against the collected figures they were
// generated from: every figure equal, and no routine's name left out. The data file lives outside
// the project (beside a checkout, in shared/data/); without it the test skips.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

#include "special/amos/amos_tables.hpp"

namespace {

namespace fs = std::filesystem;
using tw::amos::data::kTables;

fs::path FindData() {
    if (const char* env = std::getenv("TWANLYS_AMOS_DATA")) return env;
    for (fs::path dir = fs::path(TW_SOURCE_DIR); !dir.empty(); dir = dir.parent_path()) {
        const fs::path candidate = dir / "shared" / "data" / "amos-tables.json";
        if (fs::exists(candidate)) return candidate;
        if (dir == dir.root_path()) break;
    }
    return {};
}

std::string ReadAll(const fs::path& path) {
    std::ifstream in(path);
    std::stringstream buffer;
    buffer << in.rdbuf();
    return buffer.str();
}

// A routine's object: from its top-level key to the next top-level key.
std::string RoutineText(const std::string& json, const std::string& routine) {
    const std::string key = "\n \"" + routine + "\": {";
    const size_t start = json.find(key);
    if (start == std::string::npos) return {};
    const size_t end = json.find("\n \"", start + key.size());
    return json.substr(start, end == std::string::npos ? std::string::npos : end - start);
}

// A Fortran literal: the D exponent marker becomes E.
double Figure(std::string literal) {
    for (char& c : literal)
        if (c == 'D' || c == 'd') c = 'E';
    char* end = nullptr;
    const double v = std::strtod(literal.c_str(), &end);
    EXPECT_EQ(*end, '\0') << literal;
    return v;
}

bool IsDataName(const std::string& key) {
    if (key.empty() || key[0] < 'A' || key[0] > 'Z') return false;
    for (char c : key)
        if (!((c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9'))) return false;
    return true;
}

const tw::amos::data::TableEntry* Compiled(const std::string& routine, const std::string& name) {
    for (const auto& e : kTables)
        if (routine == e.routine && name == e.name) return &e;
    return nullptr;
}

TEST(AmosTables, EqualTheCollectedFigures) {
    const fs::path path = FindData();
    if (path.empty() || !fs::exists(path)) GTEST_SKIP() << "no amos-tables.json beside the checkout";
    const std::string json = ReadAll(path);
    int names = 0, figures = 0;
    // Walk the file: every routine, every upper-case key at its first level (the DATA names).
    for (size_t at = json.find("\n \""); at != std::string::npos; at = json.find("\n \"", at + 1)) {
        const size_t close = json.find('"', at + 3);
        const std::string routine = json.substr(at + 3, close - at - 3);
        if (!IsDataName(routine)) continue;
        const std::string text = RoutineText(json, routine);
        for (size_t k = text.find("\n  \""); k != std::string::npos; k = text.find("\n  \"", k + 1)) {
            const size_t kend = text.find('"', k + 4);
            const std::string name = text.substr(k + 4, kend - k - 4);
            if (!IsDataName(name)) continue;
            const auto* e = Compiled(routine, name);
            ASSERT_NE(e, nullptr) << routine << "." << name << " is not compiled";
            ++names;
            size_t v = kend + 3;  // past `": `
            const bool array = text[v] == '[';
            int index = 0;
            while (true) {
                const size_t open = text.find('"', v);
                if (array && text.find(']', v) < open) break;
                const size_t shut = text.find('"', open + 1);
                ASSERT_LT(index, array ? e->count : 1) << routine << "." << name << " has more figures";
                EXPECT_EQ(e->values[index], Figure(text.substr(open + 1, shut - open - 1)))
                    << routine << "." << name << "[" << index << "]";
                ++index;
                ++figures;
                v = shut + 1;
                if (!array) break;
            }
            EXPECT_EQ(index, array ? e->count : 1) << routine << "." << name;
            EXPECT_EQ(e->count > 0, array) << routine << "." << name;
        }
    }
    // Every compiled entry was met in the file (926 DATA values in all).
    EXPECT_EQ(names, static_cast<int>(std::size(kTables)));
    EXPECT_EQ(figures, 926);
}

}  // namespace
