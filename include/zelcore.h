/* zelcore: the support library of zelcv.
 *
 * Aligned allocation, a data-cache size query and a processor-feature query.
 * zelcv imports these by name, so an application (or a test) may interpose
 * its own definitions.
 */
#ifndef ZELCORE_H
#define ZELCORE_H

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* zelcore's own sources define ZELCORE_BUILDING_LIBRARY; zelcore.def names
 * its exports on Windows. */
#if defined(_WIN32) && !defined(ZELCORE_BUILDING_LIBRARY)
#  define ZELCORE_API __declspec(dllimport)
#elif defined(__GNUC__) && !defined(_WIN32)
#  define ZELCORE_API __attribute__((visibility("default")))
#else
#  define ZELCORE_API
#endif

/* The same calling convention as zelcv's (see ZELCV_CALL in zelcv/base.h). */
#if defined(_WIN32)
#  define ZELCORE_CALL __cdecl
#else
#  define ZELCORE_CALL
#endif

/* Alignment of every block returned by zelMalloc, in bytes. */
#define ZELCORE_ALIGNMENT 64

/* Status codes of the support library (same numbering as zelcv's). */
#define zelCoreStatusOk            0
#define zelCoreStatusNullPointer  (-8)
/* The processor and the operating system both failed to describe the caches. */
#define zelCoreStatusNoCacheInfo  (-1)

/* Processor features reported by zelGetEnabledCpuFeatures. A bit is set only
 * when the processor has the feature and the operating system enables it
 * (for the AVX family: the OS saves the YMM/ZMM state). */
#define zelCpuMMX      0x00000001u
#define zelCpuSSE      0x00000002u
#define zelCpuSSE2     0x00000004u
#define zelCpuSSE3     0x00000008u
#define zelCpuSSSE3    0x00000010u
#define zelCpuSSE41    0x00000020u
#define zelCpuSSE42    0x00000040u
#define zelCpuPOPCNT   0x00000080u
#define zelCpuAVX      0x00000100u
#define zelCpuFMA      0x00000200u
#define zelCpuAVX2     0x00000400u
#define zelCpuAVX512F  0x00000800u
#define zelCpuAVX512BW 0x00001000u

/* Returns a block of at least `bytes` bytes aligned to ZELCORE_ALIGNMENT,
 * or null when bytes <= 0 or the memory is not available. */
ZELCORE_API void* ZELCORE_CALL zelMalloc(int bytes);

/* Releases a block returned by zelMalloc; null is ignored. */
ZELCORE_API void ZELCORE_CALL zelFree(void* ptr);

/* Stores the size in bytes of the largest data (or unified) cache of this
 * processor. Returns zelCoreStatusOk, zelCoreStatusNullPointer, or
 * zelCoreStatusNoCacheInfo (and then leaves *bytes unchanged). */
ZELCORE_API int ZELCORE_CALL zelGetMaxCacheSizeB(int* bytes);

/* Returns the zelCpu* mask of features this process may use. */
ZELCORE_API uint32_t ZELCORE_CALL zelGetEnabledCpuFeatures(void);

#ifdef __cplusplus
}
#endif

#endif /* ZELCORE_H */
