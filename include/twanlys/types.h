/* Types shared by every twanlys export. */
#ifndef TWANLYS_TYPES_H
#define TWANLYS_TYPES_H

#include <stdint.h>

#include "twanlys/status.h"

#ifdef __cplusplus
#define TW_EXTERN_C extern "C"
#else
#define TW_EXTERN_C
#endif
#define TW_API TW_EXTERN_C __attribute__((visibility("default")))

/* A host-owned movable block: a pointer to a pointer to the block. The block may move whenever it
 * is resized, so it is dereferenced afresh after every resize. Blocks are packed:
 *   1-D: int32 count, then the elements;
 *   2-D: int32 rows, int32 columns, then rows*columns elements in row-major order. */
typedef void** NumericHandle;
typedef NumericHandle Array1DHandle;
typedef NumericHandle Array2DHandle;

/* Element type codes understood by HostResizeBlock. */
enum {
    TypeI32 = 3,
    TypeU8 = 5,
    TypeU32 = 7,
    TypeF32 = 9,
    TypeF64 = 10,
    TypeComplexF32 = 12,
    TypeComplexF64 = 13
};

typedef struct {
    double re;
    double im;
} ComplexDouble;

/* The host's status record, packed: flag (0 no error, 1 error), code, then a text handle that the
 * library never touches. */
#pragma pack(push, 1)
typedef struct {
    uint8_t status;
    int32_t code;
    void* source;
} ErrorCluster;
#pragma pack(pop)

/* A procedure the host runs later with the record it was registered with. */
typedef void (*HostCleanupProc)(void* record);

#endif
