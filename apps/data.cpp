#include "data.hpp"

#include <sndfile.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>

namespace twa {
namespace {

bool EndsWith(const std::string& s, const char* tail) {
    const size_t n = std::strlen(tail);
    if (s.size() < n) return false;
    for (size_t i = 0; i < n; ++i)
        if (std::tolower(static_cast<unsigned char>(s[s.size() - n + i])) != tail[i]) return false;
    return true;
}

std::string Trim(const std::string& s) {
    const size_t a = s.find_first_not_of(" \t\r\"");
    if (a == std::string::npos) return "";
    return s.substr(a, s.find_last_not_of(" \t\r\"") - a + 1);
}

std::vector<std::string> Split(const std::string& line, char separator) {
    std::vector<std::string> cells;
    std::stringstream in(line);
    std::string cell;
    while (std::getline(in, cell, separator)) cells.push_back(Trim(cell));
    if (!line.empty() && line.back() == separator) cells.emplace_back();
    return cells;
}

bool ParseNumber(const std::string& cell, double* value) {
    if (cell.empty()) return false;
    char* end = nullptr;
    *value = std::strtod(cell.c_str(), &end);
    return *end == '\0';
}

bool ReadWav(const std::string& path, Table* table, std::string* error) {
    SF_INFO info{};
    SNDFILE* f = sf_open(path.c_str(), SFM_READ, &info);
    if (f == nullptr) {
        *error = path + ": " + sf_strerror(nullptr);
        return false;
    }
    const auto channels = static_cast<size_t>(info.channels);
    const auto frames = static_cast<size_t>(info.frames);
    std::vector<double> interleaved(frames * channels);
    Progress progress("reading " + path);
    size_t done = 0;
    while (done < frames) {
        const sf_count_t want = static_cast<sf_count_t>(std::min<size_t>(65536, frames - done));
        const sf_count_t got = sf_readf_double(f, interleaved.data() + done * channels, want);
        if (got <= 0) break;
        done += static_cast<size_t>(got);
        progress.Update(static_cast<double>(done) / static_cast<double>(frames));
    }
    sf_close(f);
    table->rate = info.samplerate;
    table->columns.assign(channels, std::vector<double>(done));
    for (size_t c = 0; c < channels; ++c) {
        table->names.push_back("channel " + std::to_string(c + 1));
        for (size_t i = 0; i < done; ++i) table->columns[c][i] = interleaved[i * channels + c];
    }
    return true;
}

bool ReadCsv(const std::string& path, Table* table, std::string* error) {
    std::ifstream in(path, std::ios::binary);
    if (!in) {
        *error = path + ": " + std::strerror(errno);
        return false;
    }
    in.seekg(0, std::ios::end);
    const double size = static_cast<double>(in.tellg());
    in.seekg(0);
    Progress progress("reading " + path);
    char separator = 0;
    std::string line;
    for (int number = 1; std::getline(in, line); ++number) {
        if ((number & 4095) == 0 && size > 0) progress.Update(static_cast<double>(in.tellg()) / size);
        const std::string bare = Trim(line);
        if (bare.empty() || bare[0] == '#') continue;
        if (separator == 0) separator = bare.find(',') != std::string::npos   ? ','
                                        : bare.find(';') != std::string::npos ? ';'
                                        : bare.find('\t') != std::string::npos ? '\t'
                                                                                : ',';
        const std::vector<std::string> cells = Split(bare, separator);
        const std::string where = path + ":" + std::to_string(number) + ": ";
        if (table->columns.empty()) {
            table->columns.resize(cells.size());
            bool header = false;
            double v;
            for (const std::string& c : cells) header = header || !ParseNumber(c, &v);
            for (size_t c = 0; c < cells.size(); ++c)
                table->names.push_back(header ? cells[c] : std::to_string(c + 1));
            if (header) continue;
        }
        if (cells.size() != table->columns.size()) {
            *error = where + std::to_string(cells.size()) + " cells where the first row has " +
                     std::to_string(table->columns.size());
            return false;
        }
        for (size_t c = 0; c < cells.size(); ++c) {
            double v;
            if (!ParseNumber(cells[c], &v)) {
                *error = where + "column " + std::to_string(c + 1) + ": \"" + cells[c] + "\" is not a number";
                return false;
            }
            table->columns[c].push_back(v);
        }
    }
    if (table->columns.empty() || table->columns[0].empty()) {
        *error = path + ": no numeric rows";
        return false;
    }
    return true;
}

}  // namespace

bool ReadTable(const std::string& path, Table* table, std::string* error) {
    *table = Table{};
    return EndsWith(path, ".wav") ? ReadWav(path, table, error) : ReadCsv(path, table, error);
}

int FindColumn(const Table& table, const std::string& which, std::string* error) {
    for (size_t c = 0; c < table.names.size(); ++c)
        if (table.names[c] == which) return static_cast<int>(c);
    char* end = nullptr;
    const long number = std::strtol(which.c_str(), &end, 10);
    if (!which.empty() && *end == '\0' && number >= 1 && number <= static_cast<long>(table.columns.size()))
        return static_cast<int>(number - 1);
    *error = "no column \"" + which + "\" (the file has " + std::to_string(table.columns.size()) + ")";
    return -1;
}

Progress::Progress(std::string what) : what_(std::move(what)), active_(isatty(STDERR_FILENO) == 1) {}

Progress::~Progress() {
    if (active_ && shown_ >= 0) std::fprintf(stderr, "\r%s done\033[K\n", what_.c_str());
}

void Progress::Update(double fraction) {
    const int percent = static_cast<int>(fraction * 100);
    if (!active_ || percent == shown_) return;
    shown_ = percent;
    std::fprintf(stderr, "\r%s %3d%%", what_.c_str(), percent);
    std::fflush(stderr);
}

}  // namespace twa
