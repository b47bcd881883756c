// The arguments of one classifier application, checked, and the kernels that
// run it for each instruction set.
#ifndef ZELCV_DETECT_HAAR_APPLY_H
#define ZELCV_DETECT_HAAR_APPLY_H

#include <stddef.h>
#include <stdint.h>

#include "detect/haar_classifier.h"

namespace zelcv {
namespace haar {

struct ApplyArgs {
  const void* src;  // plain integral, window origins
  ptrdiff_t srcStride;  // elements
  const void* tilt;     // tilted integral (src again when no feature is tilted)
  ptrdiff_t tiltStride;
  const float* norm;
  ptrdiff_t normStep;  // bytes
  uint8_t* mask;
  ptrdiff_t maskStep;
  int width, height;
  float threshold;
  const Classifier* classifier;
};

// Each returns the number of non-zero mask bytes after the stage.
int64_t applySse2(const ApplyArgs& a, const float*);
int64_t applySse2(const ApplyArgs& a, const int32_t*);
namespace avx2 {
int64_t apply(const ApplyArgs& a, const float*);
int64_t apply(const ApplyArgs& a, const int32_t*);
}  // namespace avx2

}  // namespace haar
}  // namespace zelcv

#endif  // ZELCV_DETECT_HAAR_APPLY_H
