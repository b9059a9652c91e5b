// libFuzzer target: the input picks an export of the signature table and its arguments, and the
// call is judged as in the sweep. Any fault, crash or sanitizer report stops the run.
#include <cstdio>
#include <cstdlib>

#include "sweep/sweep.hpp"
#include "export_table.inc"

namespace {

// Reads the input front to back; past its end every read gives 0.
struct Bytes {
    const uint8_t* p;
    size_t n;
    uint8_t U8() { return n > 0 ? (--n, *p++) : 0; }
    template <class T>
    T Raw() {
        T v{};
        unsigned char b[sizeof(T)];
        for (auto& c : b) c = U8();
        std::memcpy(&v, b, sizeof v);
        return v;
    }
};

const std::vector<const sweep::Row*>& Rows() {
    static const std::vector<const sweep::Row*> rows = [] {
        std::vector<const sweep::Row*> v;
        for (const sweep::Row& r : kExportRows)
            if (!r.noSweep) v.push_back(&r);
        return v;
    }();
    return rows;
}

// One argument: a value of the sweep's hostile list, or (top bit of the selector) values and
// shapes read from the input, lengths and handle sizes kept small.
sweep::Choice Decode(const sweep::Arg& arg, Bytes* in) {
    const std::vector<sweep::Choice> vars = sweep::Variations(arg);
    const uint8_t selector = in->U8();
    sweep::Choice c = vars[(selector & 0x7F) % vars.size()];
    if ((selector & 0x80) == 0) return c;
    const bool length = arg.kind == sweep::Kind::Len || arg.elem == sweep::Elem::Len;
    c.i = length ? static_cast<int32_t>(in->U8() % 40) - 2 : in->Raw<int32_t>();
    c.d = in->Raw<double>();
    c.rows = in->U8() % 24;
    c.cols = in->U8() % 8;
    c.fill = in->U8();
    const size_t raw = in->U8() % 33;
    for (size_t k = 0; k < raw; ++k) c.raw.push_back(in->U8());
    return c;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Bytes in{data, size};
    const sweep::Row& row = *Rows()[in.Raw<uint16_t>() % Rows().size()];
    sweep::Case c;
    for (int32_t a = 0; a < row.nArgs; ++a) c.push_back(Decode(row.args[a], &in));
    const uint8_t how = in.U8();
    // A host grants no block of a gigabyte here: a record that sizes an output from its own
    // fields would otherwise have the fuzzer's memory limit, not the export, end the call.
    TWRTSetBlockLimit(int64_t{1} << 30);
    TWRTSetPlacement(how & 1);
    std::vector<void*> cells(static_cast<size_t>(row.nArgs), nullptr);
    const sweep::Verdict v = sweep::CallAndJudge(row, c, cells.data(), (how >> 1) % 4);
    sweep::ReleaseCells(row, cells.data(), true);
    if (!v.faults.empty()) {
        for (const std::string& f : v.faults) std::fprintf(stderr, "%s\n", f.c_str());
        std::abort();
    }
    return 0;
}
