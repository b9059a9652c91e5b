// The call frame shared by every export: counts from host blocks, resizing with the right type
// code, aligned element views, and the failure contract.
//
// A frame registers its outputs and scalar results first, validates, resizes, calls one core
// routine and hands the core's status to Finish(), which either commits the outputs or shrinks
// every registered output to 0 (dimension words zeroed) and sets every scalar result to NaN.
//
// Host blocks are packed, so the elements of a 1-D f64 or complex block may be only 4-byte
// aligned. Core routines always get naturally aligned pointers: where the host's data are not
// aligned, the frame works on a scratch copy and writes it back on success.
#pragma once

#include <bit>
#include <complex>
#include <cstdint>
#include <cstring>

#include "frame/host_link.hpp"
#include "frame/memory.hpp"
#include "frame/status_styles.hpp"
#include "twanlys/types.h"

namespace tw {

using Handle = NumericHandle;
using cdouble = std::complex<double>;
using cfloat = std::complex<float>;

inline constexpr double kNaN = std::bit_cast<double>(uint64_t{0x7FF8000000000000});

template <class T> inline constexpr int32_t kTypeCode = 0;
template <> inline constexpr int32_t kTypeCode<int32_t> = TypeI32;
template <> inline constexpr int32_t kTypeCode<uint8_t> = TypeU8;
template <> inline constexpr int32_t kTypeCode<uint32_t> = TypeU32;
template <> inline constexpr int32_t kTypeCode<float> = TypeF32;
template <> inline constexpr int32_t kTypeCode<double> = TypeF64;
template <> inline constexpr int32_t kTypeCode<cfloat> = TypeComplexF32;
template <> inline constexpr int32_t kTypeCode<cdouble> = TypeComplexF64;

struct Shape {
    int32_t rows;
    int32_t cols;
};

inline int32_t ReadWord(Handle h, int index) {
    if (h == nullptr || *h == nullptr) return 0;
    int32_t w;
    std::memcpy(&w, static_cast<unsigned char*>(*h) + 4 * index, sizeof w);
    return w;
}

// Element count of a 1-D block (0 for a null handle).
inline int32_t Count(Handle h) { return ReadWord(h, 0); }
inline Shape Dims(Handle h) { return {ReadWord(h, 0), ReadWord(h, 1)}; }

// rows * cols, or -1 when a dimension is negative or the product does not fit an i32.
inline int32_t Elements(Shape d) {
    if (d.rows < 0 || d.cols < 0) return -1;
    const int64_t n = int64_t{d.rows} * d.cols;
    return n > INT32_MAX ? -1 : static_cast<int32_t>(n);
}

enum class FailOn { Negative, NonZero };

class Frame {
public:
    explicit Frame(FailOn rule = FailOn::Negative) : rule_(rule) {}
    Frame(const Frame&) = delete;
    Frame& operator=(const Frame&) = delete;
    ~Frame() { ReleaseStages(); }

    // Registration: outputs shrink and scalar results turn NaN on failure.
    template <class T> void Output(Handle& h) { Register(h, kTypeCode<T>, 1); }
    template <class T> void Output2D(Handle& h) { Register(h, kTypeCode<T>, 2); }
    void Result(double* p, int32_t n = 1) {
        if (p != nullptr && nResults_ < kMax) results_[nResults_++] = {p, n};
    }

    // Aligned read-only view of a 1-D block's elements.
    template <class T>
    Status In(Handle h, const T** data) {
        T* p = nullptr;
        const Status s = View<T>(h, 1, Count(h), false, &p);
        *data = p;
        return s;
    }
    template <class T>
    Status In2D(Handle h, const T** data) {
        T* p = nullptr;
        const Status s = View<T>(h, 2, Elements(Dims(h)), false, &p);
        *data = p;
        return s;
    }

    // Elements worked on in place: registered as an output, written back on success.
    template <class T>
    Status InPlace(Handle& h, T** data) {
        Register(h, kTypeCode<T>, 1);
        return View<T>(h, 1, Count(h), true, data);
    }

    template <class T>
    Status InPlace2D(Handle& h, T** data) {
        Register(h, kTypeCode<T>, 2);
        const Shape d = Dims(h);
        return View<T>(h, 2, d.rows * d.cols, true, data);
    }

    // Resizes a 1-D output to n elements and stores its count. Returns the host's own status; a
    // failed resize makes Finish() shrink every output whatever the status.
    template <class T>
    Status Resize(Handle& h, int32_t n, T** data) {
        *data = nullptr;
        Register(h, kTypeCode<T>, 1);
        if (const Status s = HostResize(kTypeCode<T>, 1, &h, n)) return ResizeFailed(s);
        std::memcpy(*h, &n, sizeof n);
        return View<T>(h, 1, n, true, data);
    }
    template <class T>
    Status Resize2D(Handle& h, int32_t rows, int32_t cols, T** data) {
        *data = nullptr;
        Register(h, kTypeCode<T>, 2);
        const int32_t n = Elements({rows, cols});
        if (n < 0) return ResizeFailed(OutOfMemoryErr);
        if (const Status s = HostResize(kTypeCode<T>, 2, &h, n)) return ResizeFailed(s);
        const int32_t words[2] = {rows, cols};
        std::memcpy(*h, words, sizeof words);
        return View<T>(h, 2, n, true, data);
    }

    // True once a resize has failed (as opposed to staging an aligned view of its block).
    bool ResizeHasFailed() const { return shrinkAll_; }

    // Commits or applies the failure contract; returns the status with the releases merged in.
    Status Finish(Status s);

private:
    static constexpr int kMax = 12;
    struct Out {
        Handle* handle;
        int32_t type;
        int32_t dims;
    };
    struct Stage {
        void* copy;
        Handle* handle;  // null: no write-back
        int32_t dims;
        size_t bytes;
    };
    struct Res {
        double* p;
        int32_t n;
    };

    bool Failed(Status s) const {
        return shrinkAll_ || (rule_ == FailOn::Negative ? s < 0 : s != 0);
    }
    void Register(Handle& h, int32_t type, int32_t dims);
    Status ResizeFailed(Status s) {
        shrinkAll_ = true;
        return s;
    }
    Status Stage(Handle* h, const void* src, int32_t dims, size_t bytes, bool writeBack, void** copy);
    Status ReleaseStages();

    template <class T>
    Status View(Handle& h, int32_t dims, int32_t n, bool writeBack, T** data) {
        *data = nullptr;
        if (h == nullptr || *h == nullptr) return 0;
        auto* src = static_cast<unsigned char*>(*h) + 4 * dims;
        if (reinterpret_cast<uintptr_t>(src) % alignof(T) == 0 || n <= 0) {
            *data = reinterpret_cast<T*>(src);
            return 0;
        }
        void* copy = nullptr;
        const Status s = Stage(&h, src, dims, static_cast<size_t>(n) * sizeof(T), writeBack, &copy);
        *data = static_cast<T*>(copy);
        return s;
    }

    FailOn rule_;
    bool shrinkAll_ = false;
    int nOuts_ = 0, nStages_ = 0, nResults_ = 0;
    Out outs_[kMax];
    struct Stage stages_[kMax];
    Res results_[kMax];
};

// Cells kept by a call site between calls: an instance-data record of two pointer-sized slots.
struct InstanceRecord {
    void* slot[2];
};

// The record in an instance-data cell, allocated zeroed on first use. Null when out of memory.
InstanceRecord* AcquireInstanceRecord(void** cell);

}  // namespace tw
