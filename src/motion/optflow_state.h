// The tracking state and the layout of its work block.
#ifndef ZELCV_MOTION_OPTFLOW_STATE_H
#define ZELCV_MOTION_OPTFLOW_STATE_H

#include <stddef.h>
#include <stdint.h>

#include "core/sizes.h"
#include "zelcv.h"

struct ZeliOptFlowPyrLKState {
  ZeliSize roiSize;  // the largest level whose derivative images fit
  int winSize;
  int hint;          // stored only
  void* work;        // the work block, laid out by WorkLayout
};

namespace zelcv {
namespace optflow {

// F: the 32f Scharr filters' work-buffer size (bytes) for a (width + 5)-wide
// image, which the work block reserves as that many floats.
inline SizeCalc scharrFloats(int width) { return (SizeCalc(width) + 5) * 32 + 288; }

// ((winSize * 12 + 36) * (winSize + 3) + F + 3 * (W + 5) * (H + 5)) * 4 + 36.
SizeCalc workBlockBytes(ZeliSize roi, int winSize);

// Where the parts of a work block lie. Window arrays hold (winSize + 3)^2
// elements, `stride` a row.
struct WorkLayout {
  float* i;       // first image's window
  float* j;       // second image's window
  float* ix;      // first image's derivative windows
  float* iy;
  float* margin;  // first image's window with a one-pixel margin (per-point derivatives)
  double* ixd;    // the derivative windows in double
  double* iyd;
  size_t windowBytes;  // bytes from i to the end of iyd
  int stride;
  void* scratch;  // the derivative filters' work memory (F floats)
  float* level;   // the level as float (16u), then the two derivative images,
  float* gx;      // each (W + 5) x (H + 5) floats
  float* gy;

  WorkLayout(void* block, ZeliSize roi, int winSize);
};

}  // namespace optflow
}  // namespace zelcv

#endif  // ZELCV_MOTION_OPTFLOW_STATE_H
