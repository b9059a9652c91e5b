// The two host entries, bound by name at their first use.
#pragma once

#include <cstdint>

#include "twanlys/types.h"

namespace tw {

int32_t HostResize(int32_t typeCode, int32_t dims, NumericHandle* handle, int32_t totalElements);
int32_t HostSetCleanup(HostCleanupProc proc, void* record, int32_t mode);

}  // namespace tw
