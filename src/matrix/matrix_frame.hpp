// Pieces shared by the frames of the matrix family.
#pragma once

#include <cstdint>
#include <cstring>

#include "frame/frame.hpp"

namespace tw {

// In the status-by-pointer frames of this family a failed resize stores -20001 in the status
// cell while the export itself returns the host's code.
inline int32_t Report(int32_t* status, Status s, int32_t host) {
    if (status != nullptr) *status = s;
    return host;
}

// Runs a frame that reports the host's code of a failed resize, in the status-by-pointer style.
template <class Call>
int32_t PointerStyle(int32_t* status, Call call) {
    int32_t host = 0;
    const Status s = call(&host);
    return Report(status, s, host);
}

template <class T>
Status Out2D(Frame& f, Handle& h, int32_t rows, int32_t cols, T** p, int32_t* host) {
    if (const Status s = f.Resize2D<T>(h, rows, cols, p)) {
        if (f.ResizeHasFailed()) *host = s;  // not when only the aligned copy failed
        return OutOfMemoryErr;
    }
    return 0;
}

template <class T>
Status Out1D(Frame& f, Handle& h, int32_t n, T** p, int32_t* host) {
    if (const Status s = f.Resize<T>(h, n, p)) {
        if (f.ResizeHasFailed()) *host = s;  // not when only the aligned copy failed
        return OutOfMemoryErr;
    }
    return 0;
}

// Resizes a 1-D output and hands out its element bytes where the host put them, without the
// frame's aligned copy: for frames that must not allocate, which align their data themselves.
template <class T>
Status RawOut1D(Frame& f, Handle& h, int32_t n, unsigned char** bytes, int32_t* host) {
    f.Output<T>(h);
    if (const Status s = HostResize(kTypeCode<T>, 1, &h, n)) {
        *host = s;
        return OutOfMemoryErr;
    }
    std::memcpy(*h, &n, sizeof n);
    *bytes = static_cast<unsigned char*>(*h) + 4;
    return 0;
}

// The first T-aligned address at or after p, for a block that is at least 4-byte aligned.
template <class T>
T* AlignedIn(unsigned char* p) {
    const uintptr_t a = reinterpret_cast<uintptr_t>(p), mask = alignof(T) - 1;
    return reinterpret_cast<T*>((a + mask) & ~mask);
}

}  // namespace tw
