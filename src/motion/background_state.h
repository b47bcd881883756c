// State blocks of the foreground models, the mixture model and the
// super-resolution states. Every block starts with the same head, so that a
// call can tell a state of another kind (-17) before it reads anything else.
#ifndef ZELCV_MOTION_BACKGROUND_STATE_H
#define ZELCV_MOTION_BACKGROUND_STATE_H

#include <stdint.h>

#include "core/alloc.h"
#include "core/sizes.h"
#include "core/status.h"

namespace zelcv {
namespace background {

// Kind tags: four readable bytes each.
enum : uint32_t {
  kTagHistogram1 = 0x31484746u,  // "FGH1"
  kTagHistogram3 = 0x33484746u,  // "FGH3"
  kTagGaussian1 = 0x31474746u,   // "FGG1"
  kTagGaussian3 = 0x33474746u,   // "FGG3"
  kTagMixture = 0x4d4d4746u,     // "FGMM"
  kTagSuperRes2 = 0x32325253u,   // "SR22"
  kTagSuperRes3 = 0x33335253u,   // "SR33"
};

struct Head {
  uint32_t tag;
  int32_t width;
  int32_t height;
};

// Kind first (-17), then the ROI against the model (-6).
inline ZelStatus checkModel(const Head* head, uint32_t tag, ZeliSize roi) {
  if (head->tag != tag) return zelStatusBadContext;
  if (roi.width != head->width || roi.height != head->height) return zelStatusBadSize;
  return zelStatusOk;
}

// Bytes of a block holding a 64-byte head area and `payload` bytes, plus the
// slack that lets the payload start on a 64-byte boundary; -1 above INT_MAX.
inline int64_t blockBytes(SizeCalc payload) {
  const SizeCalc total = SizeCalc(64) + alignSize(payload, 64) + SizeCalc(64);
  return total > SizeCalc(0x7fffffff) ? -1 : total.value();
}

inline bool finitePositive(float v) { return v > 0.0f && v <= 3.402823466e+38f; }

}  // namespace background
}  // namespace zelcv

#endif  // ZELCV_MOTION_BACKGROUND_STATE_H
