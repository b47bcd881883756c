// One-dimensional Sobel taps of any derivative order and odd size: the
// coefficients of (1 + z)^(K - 1 - order) (z - 1)^order, lowest power first,
// so that tap 0 multiplies the leftmost pixel and odd orders grow towards
// the right (order 1, size 3: -1 0 1).
#include <stdint.h>

#include "core/status.h"

namespace zelcv {
namespace {

// 64-bit coefficients: the largest for 31 taps is below 2^30.
void sobelTaps(int k, int order, int64_t* taps) {
  for (int i = 0; i < k; ++i) taps[i] = i == 0;
  // Multiply by (1 + z) K - 1 - order times, then by (z - 1) order times.
  for (int m = 0; m < k - 1; ++m) {
    const bool difference = m >= k - 1 - order;
    for (int i = m + 1; i > 0; --i) taps[i] = difference ? taps[i - 1] - taps[i] : taps[i - 1] + taps[i];
    taps[0] = difference ? -taps[0] : taps[0];
  }
}

constexpr int kMaxTaps32f = 31;
constexpr int kMaxTaps16s = 17;  // every tap of 19 and more no longer fits 16 bits

template <typename T>
ZelStatus genSobel(T* kernel, int kernelSize, int order, int maxTaps) {
  if (!kernel) return zelStatusNullPointer;
  if (kernelSize < 3 || kernelSize > maxTaps || (kernelSize & 1) == 0) return zelStatusBadMaskSize;
  if (order < 0 || order >= kernelSize) return zelStatusBadArgument;
  int64_t taps[kMaxTaps32f];
  sobelTaps(kernelSize, order, taps);
  for (int i = 0; i < kernelSize; ++i) kernel[i] = T(taps[i]);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

ZELCV_ENTRY(zeliGenSobelKernel_16s)(Zel16s* kernel, int kernelSize, int order) {
  return zelcv::genSobel(kernel, kernelSize, order, zelcv::kMaxTaps16s);
}

ZELCV_ENTRY(zeliGenSobelKernel_32f)(Zel32f* kernel, int kernelSize, int order) {
  return zelcv::genSobel(kernel, kernelSize, order, zelcv::kMaxTaps32f);
}
