// The library's allocation routines. Every allocation goes through zelMalloc
// so that the support library (or an interposed one) sees it.
#ifndef ZELCV_CORE_ALLOC_H
#define ZELCV_CORE_ALLOC_H

#include <stddef.h>
#include <stdint.h>

namespace zelcv {

// Null when n <= 0. The element routines do not check n x size for overflow:
// callers pass counts bounded by sizes they have validated.
void* allocBytes(int n);
void* alloc16(int n);
void* alloc32(int n);
void release(void* p);

// Rounds p up to a multiple of `alignment` (a power of two). Init functions
// place their arrays inside caller blocks with this; size queries include
// the slack.
inline uint8_t* alignUp(void* p, size_t alignment) {
  uintptr_t v = reinterpret_cast<uintptr_t>(p);
  return reinterpret_cast<uint8_t*>((v + alignment - 1) & ~uintptr_t(alignment - 1));
}
constexpr int64_t alignSize(int64_t n, int64_t alignment) {
  return (n + alignment - 1) & ~(alignment - 1);
}

}  // namespace zelcv

#endif  // ZELCV_CORE_ALLOC_H
