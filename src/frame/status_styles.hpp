// The three ways an export hands its status to the host.
#pragma once

#include <cstdint>

#include "frame/memory.hpp"
#include "twanlys/types.h"

namespace tw {

// Status through an i32 pointer as last argument; the export's own result is 0.
inline int32_t ToPointer(int32_t* status, Status s) {
    if (status != nullptr) *status = s;
    return 0;
}

// Status through the host's ErrorCluster: an incoming error makes the call a no-op.
template <class Op>
int32_t ViaCluster(ErrorCluster* error, Op&& op) {
    if (error != nullptr && error->status != 0) return 0;
    const Status s = op();
    if (error != nullptr) {
        error->code = s;
        if (s < 0) error->status = 1;
    }
    return 0;
}

}  // namespace tw
