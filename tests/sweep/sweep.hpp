// The hostile-input sweep: builds the arguments of an export from its row of the signature table,
// calls it, and judges the call by the shared contract alone. Used by the sweep suite and by the
// fuzz target, so it needs the library's objects (the arena view) and the reference host, but no
// test framework.
#pragma once

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "frame/workspace.hpp"
#include "twanlys/status.h"
#include "twrt.h"

namespace sweep {

enum class Kind : uint8_t { H1, H2, I32, Len, F64, P, Status, Cluster, Cell, Idp, Rec, Buf, Opaque, H3 };
enum class Elem : uint8_t { None, I32, U8, U32, F32, F64, C64, C128, Len, Bytes };
enum class Dir : uint8_t { None, In, Out, Io };
enum class Style : uint8_t { Ret, Ptr, Both, Cluster, None };
enum class Result : uint8_t { I32, Void, F64, Ptr };

struct Field {
    Kind kind;
    Elem elem;
    Dir dir;
    int32_t elemBytes;
    int32_t offset;
};

struct Arg {
    const char* name;
    Kind kind;
    Elem elem;
    Dir dir;
    bool nullable;
    int32_t inWhen;  // an output left untouched while this i32 argument is non-zero; -1: none
    int32_t elemBytes;
    const Field* fields;
    int32_t nFields;
    int32_t recBytes;
    int32_t (*unreserve)(void**);
    int32_t countArg;  // the argument that counts a bare pointer; -(n + 1) for a fixed count n
};

struct Outcome {
    int64_t i = 0;
    double d = 0;
    const void* p = nullptr;
};

class Slots;

struct Row {
    const char* name;
    Style style;
    Result result;
    const Arg* args;
    int32_t nArgs;
    bool failNonZero;
    bool resultHost;
    bool noSweep;
    uint32_t keep;  // bit per argument
    uint32_t zero;
    uint32_t work;  // outputs whose contents are working memory
    int32_t stand[4];
    Outcome (*call)(Slots&);
    bool resultOom = false;  // ptr style whose result is 2 when it stores OutOfMemoryErr
    // The statuses the row allows besides 0; nAllowed -1 when the row names none (then any of
    // status.h passes). `statusSet` is the row's st= token, for messages.
    const int32_t* allowed = nullptr;
    int32_t nAllowed = -1;
    const char* statusSet = "";
};

// What one argument gets in one call.
struct Choice {
    int32_t rows = 4;  // handles: count (1-D) or rows
    int32_t cols = 4;
    int32_t depth = 4;  // 3-D handles
    uint8_t fill = 0;  // data pattern, see Fill()
    int32_t i = 0;     // i32 scalars and pointees, i32 record fields
    double d = 0.5;    // f64 scalars and pointees, f64 record fields
    bool null = false;
    std::vector<unsigned char> raw = {};  // element bytes, repeated, in place of the pattern (fuzzing)
};
using Case = std::vector<Choice>;

inline constexpr double kQuietNaN = std::bit_cast<double>(uint64_t{0x7FF8000000000000});
inline constexpr int32_t kStatusSentinel = 0x5A5A5A5A;
inline constexpr unsigned char kOutByte = 0xA5;
inline constexpr int kPatterns = 10;

inline bool IsHandle(Kind k) { return k == Kind::H1 || k == Kind::H2 || k == Kind::H3; }
inline int Dims(Kind k) { return k == Kind::H3 ? 3 : k == Kind::H2 ? 2 : 1; }

// An f32 argument by value from the f64 values: out of range is an infinity, as on the wire.
inline float ToF32(double d) {
    if (std::isfinite(d) && std::fabs(d) > static_cast<double>(std::numeric_limits<float>::max()))
        return std::copysign(std::numeric_limits<float>::infinity(), d);
    return static_cast<float>(d);
}
inline bool Writes(Dir d) { return d == Dir::Out || d == Dir::Io; }

// Values of the data patterns: 0 moderate distinct values, 1 zeros, 2 one NaN, 3 one +Inf,
// 4 one -Inf, 5 huge of both signs, 6 denormals, 7 negative, 8 all equal, 9 ascending 1, 2, ...
inline double FillF64(uint8_t pattern, int64_t k) {
    const double base = std::sin(1.3 * static_cast<double>(k) + 0.4) + static_cast<double>(k % 3);
    switch (pattern % kPatterns) {
        case 1: return 0.0;
        case 2: return k == 1 ? std::numeric_limits<double>::quiet_NaN() : base;
        case 3: return k == 0 ? std::numeric_limits<double>::infinity() : base;
        case 4: return k == 2 ? -std::numeric_limits<double>::infinity() : base;
        case 5: return (k % 2 ? -1e308 : 1e308);
        case 6: return 5e-324 * static_cast<double>(k + 1);
        case 7: return -1.0 - std::fabs(base);
        case 8: return 1.0;
        case 9: return static_cast<double>(k + 1);
        default: return base;
    }
}

// i32 lanes (permutations, pivots, counts): 0 gives 0, 1, 2, ... (a valid permutation).
inline int32_t FillI32(uint8_t pattern, int64_t k) {
    switch (pattern % kPatterns) {
        case 1: return 0;
        case 2: return -1;
        case 3: return std::numeric_limits<int32_t>::max();
        case 4: return std::numeric_limits<int32_t>::min();
        case 5: return static_cast<int32_t>(k * 7919 % 13) - 6;
        case 9: return static_cast<int32_t>(k + 1);
        default: return static_cast<int32_t>(k);
    }
}

// Element bytes from a pattern: f64 lanes while 8 bytes remain, then i32 or byte lanes.
inline void FillElements(unsigned char* p, Elem e, int32_t elemBytes, int64_t n, uint8_t pattern) {
    int64_t lane = 0;
    for (int64_t k = 0; k < n; ++k) {
        unsigned char* q = p + k * elemBytes;
        int32_t left = elemBytes;
        if (e == Elem::I32 || e == Elem::Len || e == Elem::U32) {
            const int32_t v = FillI32(pattern, k);
            std::memcpy(q, &v, 4);
            continue;
        }
        if (e == Elem::U8) {
            *q = static_cast<unsigned char>(FillI32(pattern, k) & 1);
            continue;
        }
        if (e == Elem::F32 || e == Elem::C64) {
            for (; left >= 4; left -= 4, q += 4) {
                const auto v = static_cast<float>(FillF64(pattern, lane++));
                std::memcpy(q, &v, 4);
            }
            continue;
        }
        for (; left >= 8; left -= 8, q += 8) {
            const double v = FillF64(pattern, lane++);
            std::memcpy(q, &v, 8);
        }
        for (; left >= 4; left -= 4, q += 4) {
            const int32_t v = FillI32(pattern, k);
            std::memcpy(q, &v, 4);
        }
    }
}

inline int64_t Bytes(void** h) {
    int32_t type = 0;
    int64_t bytes = 0;
    return TWRTBlockInfo(h, &type, &bytes) == 0 ? bytes : 0;
}

inline int32_t Word(void** h, int i) {
    int32_t w;
    std::memcpy(&w, static_cast<unsigned char*>(*h) + 4 * i, 4);
    return w;
}

inline int32_t TypeCode(Elem e) {
    switch (e) {
        case Elem::I32: case Elem::Len: return 3;
        case Elem::U8: return 5;
        case Elem::U32: return 7;
        case Elem::F32: return 9;
        case Elem::F64: return 10;
        case Elem::C64: return 12;
        case Elem::C128: return 13;
        default: return 0;
    }
}

// The arguments of one call, owned: handles are host arrays, pointees live in the slot.
class Slots {
public:
    Slots(const Row& row, const Case& c, void** cells) : row_(row), slot_(static_cast<size_t>(row.nArgs)) {
        // Bare pointers last: their element count comes from another argument, which may follow.
        for (int pass = 0; pass < 2; ++pass)
            for (int32_t a = 0; a < row.nArgs; ++a)
                if ((row.args[a].kind == Kind::Buf) == (pass == 1)) Build(a, c[static_cast<size_t>(a)], cells[a]);
    }
    Slots(const Slots&) = delete;
    Slots& operator=(const Slots&) = delete;
    ~Slots() {
        for (Slot& s : slot_) {
            HostDisposeHandle(s.h);
            for (void** h : s.nested) HostDisposeHandle(h);
        }
    }

    // Accessors for the generated call thunks.
    void** H(int a) const { return slot_[a].h; }
    int32_t I(int a) const { return slot_[a].i; }
    double D(int a) const { return slot_[a].d; }
    void** Cell(int a) const { return slot_[a].cell; }
    void* Ptr(int a) { return slot_[a].null ? nullptr : slot_[a].bytes.data() + slot_[a].offset; }
    void* Opaque(int) const { return nullptr; }

    // Everything an input may not change, and a digest of everything a call leaves.
    // `inputsOnly` leaves out a handle inside a record that the export may work on.
    std::vector<unsigned char> Snapshot(int a, bool inputsOnly = false) const {
        const Slot& s = slot_[a];
        std::vector<unsigned char> v(s.bytes.begin() + s.offset, s.bytes.end());
        if (s.h != nullptr) Append(&v, s.h);
        for (int32_t f = 0, k = 0; f < row_.args[a].nFields; ++f)
            if (IsHandle(row_.args[a].fields[f].kind) && static_cast<size_t>(k) < s.nested.size()) {
                if (row_.args[a].fields[f].dir == Dir::In || !inputsOnly) Append(&v, s.nested[static_cast<size_t>(k)]);
                ++k;
            }
        return v;
    }
    // Addresses of handles inside records differ from run to run and are left out, and so are
    // the contents of working memory handed out.
    uint64_t Digest() const {
        uint64_t h = 1469598103934665603ull;
        for (int a = 0; a < row_.nArgs; ++a) {
            std::vector<unsigned char> v = Snapshot(a);
            if ((row_.work >> a) & 1) v.resize(std::min<size_t>(v.size(), row_.args[a].kind == Kind::H2 ? 8 : 4));
            for (int32_t f = 0; f < row_.args[a].nFields; ++f)
                if (IsHandle(row_.args[a].fields[f].kind))
                    std::memset(v.data() + row_.args[a].fields[f].offset, 0, sizeof(void**));
            for (unsigned char b : v) h = (h ^ b) * 1099511628211ull;
        }
        return h;
    }

    // The handles an argument contributes, with their element type and direction.
    struct HandleView {
        void** h;
        Elem elem;
        int32_t elemBytes;
        Dir dir;
        int dims;
    };
    std::vector<HandleView> Handles(int a) const {
        const Arg& arg = row_.args[a];
        const Slot& s = slot_[a];
        if (IsHandle(arg.kind)) return {{s.h, arg.elem, arg.elemBytes, arg.dir, Dims(arg.kind)}};
        std::vector<HandleView> v;
        if (arg.kind == Kind::Rec && !s.null)
            for (int32_t f = 0; f < arg.nFields && v.size() < s.nested.size(); ++f)
                if (IsHandle(arg.fields[f].kind))
                    v.push_back({s.nested[v.size()], arg.fields[f].elem, arg.fields[f].elemBytes, arg.fields[f].dir,
                                 Dims(arg.fields[f].kind)});
        return v;
    }
    bool IsNull(int a) const { return slot_[a].null; }
    const std::vector<unsigned char>& Pointee(int a) const { return slot_[a].bytes; }

private:
    struct Slot {
        void** h = nullptr;       // handle argument
        std::vector<void**> nested;  // handles inside a record, in field order
        int32_t i = 0;
        double d = 0;
        void** cell = nullptr;
        bool null = false;
        std::vector<unsigned char> bytes;  // pointee or record; 16-byte aligned by the allocator
        size_t offset = 0;                 // where a bare pointer's elements start in `bytes`
    };

    static void Append(std::vector<unsigned char>* v, void** h) {
        const auto* p = static_cast<const unsigned char*>(*h);
        v->insert(v->end(), p, p + Bytes(h));
    }

    static void** MakeArray(Kind kind, Elem e, int32_t elemBytes, const Choice& c) {
        const int dims = Dims(kind);
        const int32_t shape[3] = {c.rows, c.cols, c.depth};
        int64_t n = 1;
        for (int d = 0; d < dims; ++d) n *= std::max(shape[d], 0);
        // The host makes 1-D and 2-D arrays; a 3-D block is a plain one with three words.
        void** h = dims < 3 ? TWRTNewArray(elemBytes, dims, shape)
                            : HostNewHandle(static_cast<size_t>(12 + n * elemBytes));
        if (dims == 3) std::memcpy(*h, shape, 12);
        auto* data = static_cast<unsigned char*>(*h) + 4 * dims;
        FillElements(data, e, elemBytes, n, c.fill);
        for (int64_t k = 0; !c.raw.empty() && k < n * elemBytes; ++k) data[k] = c.raw[static_cast<size_t>(k) % c.raw.size()];
        return h;
    }

    void Build(int a, const Choice& c, void*& cell) {
        const Arg& arg = row_.args[a];
        Slot& s = slot_[a];
        s.null = c.null && arg.nullable;
        switch (arg.kind) {
            case Kind::H1:
            case Kind::H2:
            case Kind::H3: s.h = MakeArray(arg.kind, arg.elem, arg.elemBytes, c); break;
            case Kind::I32:
            case Kind::Len: s.i = c.i; break;
            case Kind::F64: s.d = c.d; break;
            case Kind::Cell:
            case Kind::Idp: s.cell = &cell; break;
            case Kind::P:
                s.bytes.assign(static_cast<size_t>(arg.elemBytes), kOutByte);
                if (arg.dir != Dir::Out) {
                    if (arg.elem == Elem::F64) std::memcpy(s.bytes.data(), &c.d, 8);
                    else if (arg.elem == Elem::C128) { const double z[2] = {c.d, -c.d}; std::memcpy(s.bytes.data(), z, 16); }
                    else if (arg.elem == Elem::F32) { const auto f = static_cast<float>(c.d); std::memcpy(s.bytes.data(), &f, 4); }
                    else if (arg.elem == Elem::U8) s.bytes[0] = static_cast<unsigned char>(c.i);
                    else std::memcpy(s.bytes.data(), &c.i, 4);
                }
                break;
            case Kind::Status:
                s.bytes.resize(4);
                std::memcpy(s.bytes.data(), &kStatusSentinel, 4);
                break;
            case Kind::Cluster: s.bytes.assign(13 + 3, 0); break;
            case Kind::Rec:
                s.bytes.assign(static_cast<size_t>(arg.recBytes), kOutByte);
                for (int32_t f = 0; f < arg.nFields; ++f) {
                    const Field& fd = arg.fields[f];
                    unsigned char* at = s.bytes.data() + fd.offset;
                    if (IsHandle(fd.kind)) {
                        s.nested.push_back(MakeArray(fd.kind, fd.elem, fd.elemBytes, c));
                        std::memcpy(at, &s.nested.back(), sizeof(void**));
                    } else if (arg.dir != Dir::Out) {
                        if (fd.kind == Kind::F64) std::memcpy(at, &c.d, 8);
                        else std::memcpy(at, &c.i, fd.elem == Elem::U8 ? 1 : 4);
                    }
                }
                break;
            case Kind::Buf: {
                const int32_t n = arg.countArg < 0 ? -arg.countArg - 1 : std::clamp(slot_[arg.countArg].i, 0, 4096);
                // A bare pointer into a packed host block may be only 4-byte aligned.
                s.offset = TWRTPlacement() == 0 ? 4 : 0;
                s.bytes.assign(s.offset + static_cast<size_t>(n) * static_cast<size_t>(arg.elemBytes) + 1, 0);
                FillElements(s.bytes.data() + s.offset, arg.elem, arg.elemBytes, n, c.fill);
                break;
            }
            case Kind::Opaque: break;
        }
    }

    const Row& row_;
    std::vector<Slot> slot_;
};

// Statuses an export may give: those of status.h.
#include "status_values.inc"
inline bool KnownStatus(int32_t s) {
    return std::find(std::begin(kStatusValues), std::end(kStatusValues), s) != std::end(kStatusValues);
}
inline std::string StatusName(int32_t s) {
    const auto* at = std::find(std::begin(kStatusValues), std::end(kStatusValues), s);
    return std::to_string(s) + (at != std::end(kStatusValues) ? std::string(" ") + kStatusNames[at - kStatusValues] : "");
}
inline bool AllowedStatus(const Row& row, int32_t s) {
    return s == 0 || row.nAllowed < 0 || std::find(row.allowed, row.allowed + row.nAllowed, s) != row.allowed + row.nAllowed;
}

struct Verdict {
    std::vector<std::string> faults;
    int64_t resizes = 0;
    uint64_t digest = 0;
    int32_t status = 0;
    bool failed = false;
};

// Calls the export once on the case and judges the call. `failResize` > 0 makes that resize of
// the call fail. The caller chooses the placement and the scratch routing beforehand.
inline Verdict CallAndJudge(const Row& row, const Case& c, void** cells, int32_t failResize) {
    Verdict v;
    auto fault = [&](const std::string& what) { v.faults.push_back(std::string(row.name) + ": " + what); };
    const int64_t liveBefore = TWRTLiveBlocks();
    {
        Slots s(row, c, cells);
        std::vector<std::vector<unsigned char>> before(static_cast<size_t>(row.nArgs));
        for (int a = 0; a < row.nArgs; ++a) before[a] = s.Snapshot(a, true);

        const int64_t resizes0 = TWRTResizeCount();
        TWRTFailResizeAt(failResize);
        const Outcome out = row.call(s);
        const int32_t failedTotal = TWRTFailedResizeTotal();
        TWRTFailResizeAt(0);
        v.resizes = TWRTResizeCount() - resizes0;
        const bool hostFailed = failedTotal >= 0;
        const bool grewFailed = failedTotal > 0;

        // The status, by the row's style.
        bool known = true;
        int32_t status = 0;
        int statusArg = -1;
        for (int a = 0; a < row.nArgs; ++a)
            if (row.args[a].kind == Kind::Status) statusArg = a;
        int32_t stored = kStatusSentinel;
        if (statusArg >= 0 && !s.IsNull(statusArg)) std::memcpy(&stored, s.Pointee(statusArg).data(), 4);
        const auto result = static_cast<int32_t>(out.i);
        switch (row.style) {
            case Style::Ret: status = result; break;
            case Style::Ptr:
                if (result != 0 && !(row.resultHost && hostFailed && result == TWRTResizeFailed) &&
                    !(row.resultOom && result == 2 && (statusArg < 0 || s.IsNull(statusArg) || stored == OutOfMemoryErr)))
                    fault("result " + std::to_string(result) + " where the status goes through the pointer");
                status = stored;
                known = statusArg >= 0 && !s.IsNull(statusArg);
                break;
            case Style::Both:
                status = stored;
                known = statusArg >= 0 && !s.IsNull(statusArg);
                if (known && result != stored)
                    fault("returned " + std::to_string(result) + " but stored " + std::to_string(stored));
                break;
            case Style::Cluster: {
                int32_t code;
                std::memcpy(&code, s.Pointee(0).data() + 1, 4);
                status = code;
                break;
            }
            case Style::None:
                known = false;
                if (row.result == Result::I32 && result != 0) fault("result " + std::to_string(result) + ", not 0");
                break;
        }
        v.status = status;
        if (known && status == kStatusSentinel) fault("no status stored");
        else if (known && !KnownStatus(status) && !(hostFailed && status == TWRTResizeFailed))
            fault("status " + std::to_string(status) + " is not in status.h");
        else if (known && !AllowedStatus(row, status) && !(hostFailed && status == TWRTResizeFailed))
            fault("status " + StatusName(status) + " is outside the row's set st=" + row.statusSet);

        bool stands = false;
        for (int32_t st : row.stand) stands = stands || (st != 0 && st == status);
        // A frame that hands on the host's code of a failed resize fails with it.
        v.failed = known && !stands &&
                   (row.failNonZero ? status != 0 : status < 0 || (hostFailed && status == TWRTResizeFailed));
        if (known && grewFailed && !v.failed) fault("a resize failed but the call reports success");

        for (int a = 0; a < row.nArgs; ++a) {
            const Arg& arg = row.args[a];
            const std::string name = arg.name;
            const bool asInput = arg.inWhen >= 0 && s.I(arg.inWhen) != 0;
            const bool kept = ((row.keep >> a) & 1) || asInput;
            if (asInput && s.Snapshot(a, true) != before[a]) fault(name + " is an input but was written");
            // Inputs stay as they were: handles, pointees and records.
            if (arg.dir == Dir::In && s.Snapshot(a, true) != before[a]) fault(name + " is an input but was written");
            for (const auto& h : s.Handles(a)) {
                const int32_t n0 = Word(h.h, 0), n1 = h.dims >= 2 ? Word(h.h, 1) : 1;
                const int32_t n2 = h.dims == 3 ? Word(h.h, 2) : 1;
                if (h.dir == Dir::In) continue;
                if (v.failed && !kept && (n0 != 0 || (h.dims >= 2 && n1 != 0) || (h.dims == 3 && n2 != 0)))
                    fault(name + " not emptied on failure (status " + std::to_string(status) + ")");
                if (n0 < 0 || n1 < 0 || n2 < 0) {
                    if (Writes(h.dir) && !v.failed) fault(name + " has a negative dimension word");
                    continue;
                }
                // The count words tell the truth: the block holds what they say.
                int32_t type = 0;
                int64_t bytes = 0;
                TWRTBlockInfo(h.h, &type, &bytes);
                const int64_t need = 4 * h.dims + int64_t{n0} * n1 * n2 * h.elemBytes;
                if (need > bytes) fault(name + " says " + std::to_string(n0) + " elements but the block is smaller");
                if (type != 0 && TypeCode(h.elem) != 0 && type != TypeCode(h.elem))
                    fault(name + " resized with type code " + std::to_string(type));
            }
            // f64 results turn NaN (or 0) on failure.
            if (v.failed && !kept && !s.IsNull(a) && Writes(arg.dir)) {
                const double want = (row.zero >> a) & 1 ? 0.0 : kQuietNaN;
                auto check = [&](const unsigned char* p, const std::string& what) {
                    if (std::bit_cast<uint64_t>(want) != [&] { uint64_t b; std::memcpy(&b, p, 8); return b; }())
                        fault(what + " is not " + (want == 0.0 ? "0" : "NaN") + " on failure");
                };
                if (arg.kind == Kind::P && arg.elem == Elem::F64) check(s.Pointee(a).data(), name);
                if (arg.kind == Kind::P && arg.elem == Elem::C128)
                    for (int part = 0; part < 2; ++part) check(s.Pointee(a).data() + 8 * part, name + (part ? " imag" : " real"));
                if (arg.kind == Kind::Rec)
                    for (int32_t f = 0; f < arg.nFields; ++f)
                        if (arg.fields[f].kind == Kind::F64)
                            check(s.Pointee(a).data() + arg.fields[f].offset, name + " field " + std::to_string(f));
            }
        }
        // Scratch memory goes back on every path.
        const tw::ArenaView arena = tw::InspectArena();
        if (arena.enabled && arena.live != 0) fault(std::to_string(arena.live) + " scratch blocks left live");
        v.digest = s.Digest() ^ (static_cast<uint64_t>(static_cast<uint32_t>(result)) * 0x9E3779B97F4A7C15ull) ^
                   std::bit_cast<uint64_t>(out.d);
    }
    if (TWRTLiveBlocks() != liveBefore) fault("host blocks not returned");
    return v;
}

// The hostile values of each kind of argument; the first is the base value.
inline std::vector<Choice> Variations(const Arg& arg) {
    constexpr double kInf = std::numeric_limits<double>::infinity();
    constexpr int32_t kMax = std::numeric_limits<int32_t>::max(), kMin = std::numeric_limits<int32_t>::min();
    static const int32_t i32s[] = {0, 1, -1, 2, 3, 7, 64, kMax, kMin};
    static const int32_t lens[] = {4, 0, 1, -1, 2, 3, 7, 16, kMin};
    static const double f64s[] = {0.5, 0, 1, -1, 2.5, -0.5, 1e-300, 1e308, -1e308, kQuietNaN, kInf, -kInf, 100};
    static const int32_t counts[] = {0, 1, 2, 3, 5, 10, 17};
    static const int32_t shapes[][2] = {{0, 0}, {0, 4}, {4, 0}, {1, 1}, {1, 4}, {4, 1}, {2, 3}, {3, 2}, {3, 3}, {5, 5}};
    static const int32_t cubes[][3] = {{0, 0, 0}, {4, 4, 0}, {1, 1, 1}, {3, 3, 3}, {2, 4, 4}, {5, 3, 6}, {6, 5, 3}};
    std::vector<Choice> v(1);
    // What varies: the scalar itself, the pointee of an input pointer, or the fields of an input
    // record; the shape and data of a handle, also of one inside a record.
    bool ints = arg.kind == Kind::I32 || (arg.kind == Kind::P && (arg.elem == Elem::I32 || arg.elem == Elem::U8));
    bool lengths = arg.kind == Kind::Len || (arg.kind == Kind::P && arg.elem == Elem::Len);
    bool reals = arg.kind == Kind::F64 ||
                 (arg.kind == Kind::P && (arg.elem == Elem::F64 || arg.elem == Elem::F32 || arg.elem == Elem::C128));
    Kind handle = IsHandle(arg.kind) ? arg.kind : Kind::Opaque;
    for (int32_t f = 0; arg.kind == Kind::Rec && f < arg.nFields; ++f) {
        ints = ints || arg.fields[f].kind == Kind::I32;
        reals = reals || arg.fields[f].kind == Kind::F64;
        if (IsHandle(arg.fields[f].kind)) handle = arg.fields[f].kind;
    }
    if (arg.kind == Kind::P || arg.kind == Kind::Rec) {
        if (arg.dir == Dir::Out) ints = lengths = reals = false;
    }
    if (lengths) v[0].i = 4;
    if (ints || lengths)
        for (int32_t x : lengths ? std::vector<int32_t>(std::begin(lens) + 1, std::end(lens))
                                 : std::vector<int32_t>(std::begin(i32s) + 1, std::end(i32s)))
            v.push_back(Choice{.i = x});
    if (reals)
        for (size_t k = 1; k < std::size(f64s); ++k) v.push_back(Choice{.i = v[0].i, .d = f64s[k]});
    if (handle == Kind::H1)
        for (int32_t n : counts) v.push_back(Choice{.rows = n});
    if (handle == Kind::H2)
        for (const auto& s : shapes) v.push_back(Choice{.rows = s[0], .cols = s[1]});
    if (handle == Kind::H3)
        for (const auto& s : cubes) v.push_back(Choice{.rows = s[0], .cols = s[1], .depth = s[2]});
    if (handle != Kind::Opaque && (arg.dir != Dir::Out || arg.kind == Kind::Rec))
        for (uint8_t p = 1; p < kPatterns; ++p) v.push_back(Choice{.fill = p});
    if (arg.nullable) v.push_back(Choice{.null = true});
    return v;
}

inline Case BaseCase(const Row& row) {
    Case c;
    for (int32_t a = 0; a < row.nArgs; ++a) c.push_back(Variations(row.args[a])[0]);
    return c;
}

// The base case, every argument through its hostile values one at a time, and `random` cases
// that draw every argument at once (a fixed stream, so every run makes the same calls).
inline std::vector<Case> Cases(const Row& row, int random) {
    std::vector<Case> cases{BaseCase(row)};
    std::vector<std::vector<Choice>> vars;
    for (int32_t a = 0; a < row.nArgs; ++a) vars.push_back(Variations(row.args[a]));
    for (int32_t a = 0; a < row.nArgs; ++a)
        for (size_t k = 1; k < vars[a].size(); ++k) {
            cases.push_back(cases[0]);
            cases.back()[a] = vars[a][k];
        }
    uint64_t state = 0x2545F4914F6CDD1Dull;
    for (const char* p = row.name; *p; ++p) state = (state ^ static_cast<unsigned char>(*p)) * 0x100000001B3ull;
    for (int r = 0; r < random; ++r) {
        Case c;
        for (int32_t a = 0; a < row.nArgs; ++a) {
            state = state * 6364136223846793005ull + 1442695040888963407ull;
            c.push_back(vars[a][(state >> 33) % vars[a].size()]);
        }
        cases.push_back(c);
    }
    return cases;
}

// Releases what the call sites of a row keep: instance data through the row's unreserve
// export; work cells through the cleanups the library registered with the host (all of them, so
// a caller with other threads running leaves that to later).
inline void ReleaseCells(const Row& row, void** cells, bool runCleanups) {
    bool cleanups = false;
    for (int a = 0; a < row.nArgs; ++a) {
        if (row.args[a].kind == Kind::Idp && row.args[a].unreserve != nullptr) row.args[a].unreserve(&cells[a]);
        cleanups = cleanups || row.args[a].kind == Kind::Cell;
        cells[a] = nullptr;
    }
    if (cleanups && runCleanups) TWRTRunCleanups(2);
}

}  // namespace sweep
