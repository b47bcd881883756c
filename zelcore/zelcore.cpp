// The support library: aligned allocation, cache size and processor features.
#include "zelcore.h"

#include <cpuid.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#if defined(_WIN32)
#include <malloc.h>
#endif

extern "C" {

void* zelMalloc(int bytes) {
  if (bytes <= 0) return nullptr;
#if defined(_WIN32)
  // The Windows C runtime has no aligned_alloc; its aligned blocks are
  // released by _aligned_free only.
  return _aligned_malloc(static_cast<size_t>(bytes), ZELCORE_ALIGNMENT);
#else
  // Round up so that aligned_alloc's size-multiple rule always holds.
  size_t size = (static_cast<size_t>(bytes) + ZELCORE_ALIGNMENT - 1) & ~size_t(ZELCORE_ALIGNMENT - 1);
  return aligned_alloc(ZELCORE_ALIGNMENT, size);
#endif
}

#if defined(_WIN32)
void zelFree(void* ptr) { _aligned_free(ptr); }
#else
void zelFree(void* ptr) { free(ptr); }
#endif

}  // extern "C"

namespace {

#if defined(_WIN32)
// Windows has no sysfs; the processor's own description serves.
long largestCacheFromOs() { return 0; }
#else
// Parses a sysfs cache size such as "32K" or "8192K" or "16M".
long parseCacheSize(const char* text) {
  char* end = nullptr;
  long value = strtol(text, &end, 10);
  if (end == text || value <= 0) return 0;
  if (*end == 'K') value *= 1024;
  else if (*end == 'M') value *= 1024 * 1024;
  return value;
}

bool readLine(const char* path, char* line, int size) {
  FILE* f = fopen(path, "r");
  if (!f) return false;
  bool ok = fgets(line, size, f) != nullptr;
  fclose(f);
  return ok;
}

// The operating system's view of the caches of the first processor.
long largestCacheFromOs() {
  long largest = 0;
  for (int index = 0; index < 16; ++index) {
    char path[96], line[64];
    snprintf(path, sizeof path, "/sys/devices/system/cpu/cpu0/cache/index%d/type", index);
    if (!readLine(path, line, sizeof line)) break;
    if (strncmp(line, "Instruction", 11) == 0) continue;
    snprintf(path, sizeof path, "/sys/devices/system/cpu/cpu0/cache/index%d/size", index);
    if (!readLine(path, line, sizeof line)) continue;
    long size = parseCacheSize(line);
    if (size > largest) largest = size;
  }
  return largest;
}
#endif

// Deterministic cache parameters (leaf 4 on one vendor, 0x8000001D on the other).
long largestCacheFromCpuid() {
  unsigned a, b, c, d;
  unsigned leaves[2] = {4u, 0x8000001Du};
  long largest = 0;
  for (unsigned leaf : leaves) {
    if (static_cast<unsigned>(__get_cpuid_max(leaf & 0x80000000u, nullptr)) < leaf) continue;
    for (unsigned sub = 0; sub < 16; ++sub) {
      __cpuid_count(leaf, sub, a, b, c, d);
      unsigned type = a & 0x1F;
      if (type == 0) break;
      if (type == 2) continue;  // instruction cache
      long ways = ((b >> 22) & 0x3FF) + 1;
      long partitions = ((b >> 12) & 0x3FF) + 1;
      long lineSize = (b & 0xFFF) + 1;
      long sets = static_cast<long>(c) + 1;
      long size = ways * partitions * lineSize * sets;
      if (size > largest) largest = size;
    }
    if (largest > 0) break;
  }
  return largest;
}

uint64_t readXcr0() {
  uint32_t lo, hi;
  __asm__ volatile("xgetbv" : "=a"(lo), "=d"(hi) : "c"(0));
  return (static_cast<uint64_t>(hi) << 32) | lo;
}

}  // namespace

extern "C" {

int zelGetMaxCacheSizeB(int* bytes) {
  if (!bytes) return zelCoreStatusNullPointer;
  // The caches do not change while the process runs, and callers ask on
  // every call of a streaming function: look them up once.
  static const long size = [] {
    long fromOs = largestCacheFromOs();
    return fromOs > 0 ? fromOs : largestCacheFromCpuid();
  }();
  if (size <= 0) return zelCoreStatusNoCacheInfo;
  *bytes = size > 0x7FFFFFFFL ? 0x7FFFFFFF : static_cast<int>(size);
  return zelCoreStatusOk;
}

uint32_t zelGetEnabledCpuFeatures(void) {
  unsigned a, b, c, d;
  if (!__get_cpuid(1, &a, &b, &c, &d)) return 0;
  uint32_t mask = 0;
  if (d & bit_MMX) mask |= zelCpuMMX;
  if (d & bit_SSE) mask |= zelCpuSSE;
  if (d & bit_SSE2) mask |= zelCpuSSE2;
  if (c & bit_SSE3) mask |= zelCpuSSE3;
  if (c & bit_SSSE3) mask |= zelCpuSSSE3;
  if (c & bit_SSE4_1) mask |= zelCpuSSE41;
  if (c & bit_SSE4_2) mask |= zelCpuSSE42;
  if (c & bit_POPCNT) mask |= zelCpuPOPCNT;
  // The AVX family counts only when the OS saves the wide registers.
  bool osSavesYmm = false, osSavesZmm = false;
  if ((c & bit_OSXSAVE) != 0) {
    uint64_t xcr0 = readXcr0();
    osSavesYmm = (xcr0 & 0x6) == 0x6;
    osSavesZmm = (xcr0 & 0xE6) == 0xE6;
  }
  if (osSavesYmm) {
    if (c & bit_AVX) mask |= zelCpuAVX;
    if (c & bit_FMA) mask |= zelCpuFMA;
    if (__get_cpuid_max(0, nullptr) >= 7) {
      __cpuid_count(7, 0, a, b, c, d);
      if (b & bit_AVX2) mask |= zelCpuAVX2;
      if (osSavesZmm && (b & bit_AVX512F)) mask |= zelCpuAVX512F;
      if (osSavesZmm && (b & bit_AVX512BW)) mask |= zelCpuAVX512BW;
    }
  }
  return mask;
}

}  // extern "C"
