#include "arith/store_mode.h"

#include "zelcore.h"

namespace zelcv {

StoreMode chooseStoreMode(int bytesPerPixel, ZeliSize roi) {
  int cacheBytes = 0;
  (void)zelGetMaxCacheSizeB(&cacheBytes);  // the status is deliberately ignored
  return storeModeFor(int64_t(bytesPerPixel) * roi.width * roi.height, cacheBytes);
}

}  // namespace zelcv
