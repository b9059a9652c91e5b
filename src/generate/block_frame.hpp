// The frames of the generators that fill a new block of n elements.
#pragma once

#include <cstdint>

#include "frame/frame.hpp"

namespace tw {

// Status through the pointer; the export's result is 0, or the host's own code when resizing the
// output failed. `checked` is the outcome of the export's own tests; core(f, y, n) fills y.
template <class T, class Core>
int32_t FillByPointer(Handle out, int32_t n, Status checked, int32_t* status, Core core) {
    Frame f;
    f.Output<T>(out);
    T* y = nullptr;
    int32_t resized = 0;
    Status s = checked;
    if (s == 0 && (resized = f.Resize(out, n, &y)) != 0) {
        s = OutOfMemoryErr;
        if (!f.ResizeHasFailed()) resized = 0;  // only the aligned copy failed, not the host
    }
    if (s == 0) s = core(f, y, n);
    ToPointer(status, f.Finish(s));
    return resized;
}

// The same with the status as the export's result.
template <class T, class Core>
Status FillReturned(Handle out, int32_t n, Status checked, Core core) {
    Frame f;
    f.Output<T>(out);
    T* y = nullptr;
    Status s = checked;
    if (s == 0 && f.Resize(out, n, &y) != 0) s = OutOfMemoryErr;
    if (s == 0) s = core(f, y, n);
    return f.Finish(s);
}

}  // namespace tw
