/* Binding to the host and release of per-call-site caches. */
#ifndef TWANLYS_LINK_H
#define TWANLYS_LINK_H

#include "twanlys/types.h"

/* Names the module in which HostResizeBlock and HostSetCleanupProc are looked up from now on (a
 * handle as returned by dlopen) and returns it. */
TW_API void* SetTWRTModule(void* module);

/* Releases what an instance-data cell of a transform holds and nulls the cell. Always 0. */
TW_API int32_t TransformUnreserveProc(void** cell);

/* Releases what an instance-data cell of a measurement holds and nulls the cell. Always 0. */
TW_API int32_t MeasurementUnreserveProc(void** cell);

#endif
