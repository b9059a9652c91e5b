// Reading user data for twa: CSV (one or more numeric columns, an optional header row) or WAV
// (channels become columns). Errors come back as one line naming the file, line and column.
#pragma once

#include <string>
#include <vector>

namespace twa {

struct Table {
    std::vector<std::string> names;           // one per column ("1", "2", ... without a header)
    std::vector<std::vector<double>> columns;
    double rate = 0;                           // samples per second where the file says (WAV)
};

// Reads FILE (".wav" by extension, CSV otherwise). On failure returns false with *error set.
bool ReadTable(const std::string& path, Table* table, std::string* error);

// The column a user named: a 1-based number or a header name; -1 with *error set if none.
int FindColumn(const Table& table, const std::string& which, std::string* error);

// Progress on standard error, only when it is a terminal: "reading FILE 42%".
class Progress {
public:
    explicit Progress(std::string what);
    ~Progress();
    void Update(double fraction);

private:
    std::string what_;
    int shown_ = -1;
    bool active_;
};

}  // namespace twa
