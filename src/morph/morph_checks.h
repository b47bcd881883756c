// Step checks shared by the flat and compound morphology exports.
#ifndef ZELCV_MORPH_MORPH_CHECKS_H
#define ZELCV_MORPH_MORPH_CHECKS_H

#include <stdint.h>

#include "zelcv.h"

namespace zelcv {
namespace morph {

// Row bytes against both steps, then for 16-bit data odd steps. 32-bit float
// steps are compared with the row bytes only.
template <typename T, int C>
ZelStatus checkMorphSteps(int srcStep, int dstStep, int width) {
  const int64_t rowBytes = int64_t(width) * C * int64_t(sizeof(T));
  if (srcStep < rowBytes || dstStep < rowBytes) return zelStatusBadStep;
  if (sizeof(T) == 2 && ((srcStep | dstStep) & 1)) return zelStatusMisalignedStep;
  return zelStatusOk;
}

// 1-bit images: negative bit offsets (-6), then the bytes of a row, (width +
// 7) / 8, against both steps (-14).
inline ZelStatus checkBitSteps(int srcStep, int srcBitOffset, int dstStep, int dstBitOffset, int width) {
  if (srcBitOffset < 0 || dstBitOffset < 0) return zelStatusBadSize;
  const int64_t rowBytes = (int64_t(width) + 7) / 8;
  if (srcStep < rowBytes || dstStep < rowBytes) return zelStatusBadStep;
  return zelStatusOk;
}

}  // namespace morph
}  // namespace zelcv

#endif  // ZELCV_MORPH_MORPH_CHECKS_H
