/* twrt: a small reference host runtime for calling twanlys outside Tarnwell.
 *
 * It owns movable array handles, implements the two host entries the library binds to
 * (HostResizeBlock, HostSetCleanupProc), runs registered cleanups on request, and has hooks that
 * tests use to fail resizes, count them, and choose where element data lands in a block. */
#ifndef TWRT_H
#define TWRT_H

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

typedef void** TWRTHandle;
typedef void (*TWRTCleanupProc)(void* record);

extern const int32_t gTWRTVersion;

/* A handle to a zeroed block of `bytes` bytes (1-D placement). Null on failure. */
TWRTHandle HostNewHandle(size_t bytes);
/* A handle to a zeroed array of elements of `elementSize` bytes with its dimension words set;
 * `dims` is 1 or 2 and `shape` holds the dimensions. */
TWRTHandle TWRTNewArray(int32_t elementSize, int32_t dims, const int32_t* shape);
void HostDisposeHandle(TWRTHandle handle);

/* The host entries. Resize keeps the leading bytes, may move the block, and returns 0 or
 * TWRTResizeFailed. It does not write the dimension words. By default it keeps the block where
 * its size allows, otherwise reallocates it, and fills no new byte. */
int32_t HostResizeBlock(int32_t typeCode, int32_t dims, TWRTHandle* handle, int32_t totalElements);
int32_t HostSetCleanupProc(TWRTCleanupProc proc, void* record, int32_t mode);

enum { TWRTResizeFailed = 2 };

/* Runs and forgets the cleanups registered with `mode` (all modes when mode < 0). */
int32_t TWRTRunCleanups(int32_t mode);
/* Number of registrations currently held for `mode` (all modes when mode < 0). */
int32_t TWRTCleanupCount(int32_t mode);

/* Test hooks. */
void TWRTFailResizeAt(int32_t n); /* the n-th resize from now fails (0: none) */
/* Element total that the failed resize asked for; -1 while none failed since TWRTFailResizeAt. */
int32_t TWRTFailedResizeTotal(void);
int64_t TWRTResizeCount(void);    /* resizes so far, failed ones included */
int64_t TWRTAllocCount(void);     /* blocks allocated so far (new handles and resizes) */
int64_t TWRTLiveBlocks(void);     /* blocks allocated and not yet released */
/* Type code of the resize that made the block behind the handle (0 for a new array) and its
 * bytes, dimension words included; -1 for a null handle. */
int32_t TWRTBlockInfo(TWRTHandle handle, int32_t* typeCode, int64_t* bytes);
/* 0: packed, 1-D element data at 4 mod 8 as the original host; 1: element data 64-byte aligned. */
void TWRTSetPlacement(int32_t aligned);
int32_t TWRTPlacement(void);
/* Resize modes, bits that tests combine: move the block on every resize (catches stale element
 * pointers), and fill the bytes a resize adds with kTWRTPoisonByte (catches reads of cells never
 * written). 0 is the default behaviour. */
enum { TWRTResizeMove = 1, TWRTResizePoison = 2, kTWRTPoisonByte = 0x7F };
void TWRTSetResizeMode(int32_t mode);
int32_t TWRTResizeMode(void);
/* Largest block, in bytes with its dimension words, that a resize grants (0: no limit, the
 * default). A larger request fails as it would on a host short of memory. */
void TWRTSetBlockLimit(int64_t bytes);
/* Element size of a type code, 0 for an unknown code. */
int32_t TWRTElementSize(int32_t typeCode);

#ifdef __cplusplus
}
#endif

#endif
