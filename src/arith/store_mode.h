// The store-mode rule of the accumulation and difference functions: a call
// that touches at least as many bytes as the largest cache holds writes with
// non-temporal stores, so that it does not evict the caller's working set.
#ifndef ZELCV_ARITH_STORE_MODE_H
#define ZELCV_ARITH_STORE_MODE_H

#include <stdint.h>

#include "kernels/row_driver.h"
#include "zelcv.h"

namespace zelcv {

// The decision itself: ordinary stores only when strictly below the cache.
inline StoreMode storeModeFor(int64_t bytesTouched, int cacheBytes) {
  return bytesTouched < cacheBytes ? StoreMode::Ordinary : StoreMode::Streaming;
}

// Asks the support library for the cache size (on every call; a failed query
// leaves 0, which selects streaming) and applies the rule to
// bytesPerPixel x width x height, computed in 64 bits.
StoreMode chooseStoreMode(int bytesPerPixel, ZeliSize roi);

}  // namespace zelcv

#endif  // ZELCV_ARITH_STORE_MODE_H
