// What the derivative and smoothing filters share: the mask and border
// checks and the work-buffer formulas.
#ifndef ZELCV_FILTER_FILTERS_COMMON_H
#define ZELCV_FILTER_FILTERS_COMMON_H

#include <stdint.h>

#include "zelcv.h"

namespace zelcv {
namespace filters {

// zelMaskSize3x3, or zelMaskSize5x5 where the operation has it.
inline ZelStatus checkMask(int mask, bool has5x5) {
  if (mask == zelMaskSize3x3 || (has5x5 && mask == zelMaskSize5x5)) return zelStatusOk;
  return zelStatusBadMaskSize;
}

inline int maskTaps(int mask) { return mask == zelMaskSize5x5 ? 5 : 3; }

// Every kind of the shared border routine, with any side flags; only the
// kind (the value with the flag bits cleared) is examined.
inline ZelStatus checkBorder(ZeliBorderType border) {
  switch (border & ~0xF0) {
    case zelBorderConstant:
    case zelBorderReplicate:
    case zelBorderWrap:
    case zelBorderMirror:
    case zelBorderMirrorWithEdge:
    case zelBorderInMemory:
      return zelStatusOk;
    default:
      return zelStatusBadBorder;
  }
}

// 8-bit sources: two rows of width + 4 16-bit column values and one row of
// width border pixels, plus alignment.
inline int64_t integerBufferBytes(int width) { return 5 * int64_t(width) + 64; }

// Floating-point engine, for kernels of K taps, `terms` separable terms and
// `channels` interleaved channels: one extended source row, its two border
// ends, K intermediate rows per term, one result row, the prepared taps and
// row pointers (16 + 8 bytes a tap and term), and alignment.
inline int64_t floatBufferBytes(int width, int64_t k, int channels, int terms) {
  const int64_t ch = channels;
  return ch * (4 * terms * k + 8) * width + 8 * ch * (k - 1) + 24 * terms * k + 128;
}

}  // namespace filters
}  // namespace zelcv

#endif  // ZELCV_FILTER_FILTERS_COMMON_H
