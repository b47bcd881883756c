#include "arith/store_mode.h"

#include "core/sizes.h"
#include "zelcore.h"

namespace zelcv {

StoreMode chooseStoreMode(int bytesPerPixel, ZeliSize roi) {
  int cacheBytes = 0;
  (void)zelGetMaxCacheSizeB(&cacheBytes);  // the status is deliberately ignored
  // Saturating: width x height x bytes can exceed 64 bits for sizes near
  // INT_MAX, and any such image is far beyond every cache.
  return storeModeFor((SizeCalc(bytesPerPixel) * roi.width * roi.height).value(), cacheBytes);
}

}  // namespace zelcv
