// The Canny edge detector: derivative-input entries (16s, 32f) and the 8-bit
// image entry that computes its own derivatives. All three stream the image
// through three magnitude rows; only the candidate map and the edge stack
// cover the whole image.
#include <climits>
#include <cstring>

#include "core/alloc.h"
#include "core/sizes.h"
#include "core/status.h"
#include "features/canny_kernels.h"
#include "filter/border.h"
#include "filter/derivative.h"

namespace zelcv {
namespace {

using canny::LowRule;
using canny::Norm;

constexpr int kSmallSide = 65533;  // both sides below: 16-bit stack coordinates

bool smallImage(ZeliSize roi) { return roi.width < kSmallSide && roi.height < kSmallSide; }

// Saturating: products of two sides near INT_MAX exceed 64 bits.
int64_t derivativeInputBufferBytes(ZeliSize roi) {
  const SizeCalc w = roi.width, h = roi.height;
  const SizeCalc perRow = smallImage(roi) ? 5 : 9;
  return ((perRow * h + 2 * perRow) * (w + 2) + 16 * w + 160).value();
}

int borderMargin(int mask) { return mask == zelMaskSize5x5 ? 4 : 2; }

int64_t imageInputBufferBytes(ZeliSize roi, int mask) {
  const SizeCalc k = borderMargin(mask);
  return ((5 * (roi.height + k) + 16) * (roi.width + k) + 64).value();
}

// NaN thresholds are refused along with the documented cases.
bool thresholdsValid(float low, float high) { return low >= 0.0f && low <= high; }

// Carves the parts the detector shares out of the caller's buffer. Each part
// is only as aligned as its element type needs: the size formulas leave no
// room for more.
struct Workspace {
  uint8_t* map;        // (width + 2) x (height + 2), zero frame
  float* ring;         // three rows of width + 2 magnitudes
  uint8_t* codes;      // two rows of width direction codes
  uint8_t* next;       // first free byte
  int mapStride;

  Workspace(uint8_t* buffer, ZeliSize roi) {
    mapStride = roi.width + 2;
    map = alignUp(buffer, 32);
    ring = reinterpret_cast<float*>(alignUp(map + size_t(mapStride) * (roi.height + 2), alignof(float)));
    codes = reinterpret_cast<uint8_t*>(ring + 3 * size_t(mapStride));
    next = codes + 2 * size_t(roi.width);
  }
};

// Thins each row as soon as the row below has its magnitudes, then grows the
// edges. produce(y, mag, codes) writes row y's thresholded magnitudes and
// direction codes.
template <typename Entry, typename Produce>
void detect(const Workspace& ws, ZeliSize roi, float high, Zel8u* dst, int dstStep, Produce&& produce) {
  const int w = roi.width, h = roi.height, stride = ws.mapStride;
  for (int y = 0; y < h; ++y) std::memset(dst + ptrdiff_t(y) * dstStep, 0, size_t(w));
  std::memset(ws.map, 0, size_t(stride) * (h + 2));
  std::memset(ws.ring, 0, 3 * size_t(stride) * sizeof(float));
  Entry* stack = reinterpret_cast<Entry*>(alignUp(ws.next, alignof(Entry)));
  Entry* top = stack;
  auto push = [&](int r, int c) { *top++ = Entry::make(r, c, stride); };
  // Row y lives in slot (y + 3) % 3; row -1 starts out zero.
  auto ringRow = [&](int y) { return ws.ring + size_t((y + 3) % 3) * stride; };

  produce(0, ringRow(0) + 1, ws.codes);
  for (int y = 0; y < h; ++y) {
    float* below = ringRow(y + 1);
    if (y + 1 < h)
      produce(y + 1, below + 1, ws.codes + size_t((y + 1) & 1) * w);
    else
      std::memset(below, 0, size_t(stride) * sizeof(float));
    canny::thinRow(ringRow(y - 1), ringRow(y), below, ws.codes + size_t(y & 1) * w, w, high,
                   ws.map + size_t(y + 1) * stride + 1, dst + ptrdiff_t(y) * dstStep, y, push);
  }
  canny::hysteresis(stack, top, ws.map, stride, dst, dstStep);
}

template <typename T>
ZelStatus cannyFromDerivatives(const T* srcDx, int srcDxStep, const T* srcDy, int srcDyStep, Zel8u* dst,
                               int dstStep, ZeliSize roi, float low, float high, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(srcDx, srcDxStep), image(srcDy, srcDyStep), image(dst, dstStep)}, roi,
                                {buffer}))
    return s;
  if (!thresholdsValid(low, high)) return zelStatusBadArgument;
  if (derivativeInputBufferBytes(roi) > INT_MAX) return zelStatusBadSize;

  const Workspace ws(buffer, roi);
  auto produce = [&](int y, float* mag, uint8_t* codes) {
    const T* dx = reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(srcDx) + ptrdiff_t(y) * srcDxStep);
    const T* dy = reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(srcDy) + ptrdiff_t(y) * srcDyStep);
    canny::magnitudeRow<LowRule::kKeepEqual, Norm::kL1>(dx, dy, roi.width, low, 0, mag, codes);
  };
  if (smallImage(roi))
    detect<canny::Pair16>(ws, roi, high, dst, dstStep, produce);
  else
    detect<canny::Pair32>(ws, roi, high, dst, dstStep, produce);
  return zelStatusOk;
}

template <Norm N>
void cannyFromImage(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roi,
                    DerivativeKernel kernel, ZeliBorderType border, Zel8u borderValue, float low, float high,
                    Zel8u* buffer) {
  // The derivative rows and their scratch come before the stack.
  Workspace ws(buffer, roi);
  Zel16s* dx = reinterpret_cast<Zel16s*>(alignUp(ws.next, alignof(Zel16s)));
  Zel16s* dy = dx + roi.width;
  uint8_t* scratch = reinterpret_cast<uint8_t*>(dy + roi.width);
  const DerivativeRows rows(src, srcStep, roi, kernel, border, borderValue, scratch);
  ws.next = scratch + DerivativeRows::scratchBytes(kernel, roi.width);
  const int32_t squaredLimit = N == Norm::kL2 ? canny::squaredLowLimit<LowRule::kStrict>(low) : 0;
  auto produce = [&](int y, float* mag, uint8_t* codes) {
    rows.row(y, dx, dy);
    canny::magnitudeRow<LowRule::kStrict, N>(dx, dy, roi.width, low, squaredLimit, mag, codes);
  };
  // The size formula has room for four bytes a stack entry only.
  if (smallImage(roi))
    detect<canny::Pair16>(ws, roi, high, dst, dstStep, produce);
  else
    detect<canny::MapOffset32>(ws, roi, high, dst, dstStep, produce);
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliCannyGetSize)(ZeliSize roiSize, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  const int64_t bytes = derivativeInputBufferBytes(roiSize);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliCannyBorderGetSize)(ZeliSize roiSize, int filterType, int mask, int norm, int* bufferSize) {
  (void)filterType;
  (void)norm;
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  if (mask != zelMaskSize3x3 && mask != zelMaskSize5x5) return zelStatusBadMaskSize;
  const int64_t bytes = imageInputBufferBytes(roiSize, mask);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliCanny_16s8u_C1R)(const Zel16s* srcDx, int srcDxStep, const Zel16s* srcDy, int srcDyStep,
                                 Zel8u* dst, int dstStep, ZeliSize roiSize, Zel32f lowThreshold,
                                 Zel32f highThreshold, Zel8u* buffer) {
  return cannyFromDerivatives(srcDx, srcDxStep, srcDy, srcDyStep, dst, dstStep, roiSize, lowThreshold,
                              highThreshold, buffer);
}

ZELCV_ENTRY(zeliCanny_32f8u_C1R)(const Zel32f* srcDx, int srcDxStep, const Zel32f* srcDy, int srcDyStep,
                                 Zel8u* dst, int dstStep, ZeliSize roiSize, Zel32f lowThreshold,
                                 Zel32f highThreshold, Zel8u* buffer) {
  return cannyFromDerivatives(srcDx, srcDxStep, srcDy, srcDyStep, dst, dstStep, roiSize, lowThreshold,
                              highThreshold, buffer);
}

ZELCV_ENTRY(zeliCannyBorder_8u_C1R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                    int filterType, int mask, ZeliBorderType borderType, Zel8u borderValue,
                                    Zel32f lowThreshold, Zel32f highThreshold, int norm, Zel8u* buffer) {
  // The mask is checked before anything else, pointers included.
  if ((mask != zelMaskSize3x3 && mask != zelMaskSize5x5) || (filterType == zelFilterScharr && mask == zelMaskSize5x5))
    return zelStatusBadMaskSize;
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep)}, roiSize, {buffer})) return s;
  if ((filterType != zelFilterSobel && filterType != zelFilterScharr) || (norm != zelNormL1 && norm != zelNormL2) ||
      !thresholdsValid(lowThreshold, highThreshold))
    return zelStatusBadArgument;
  const int kind = borderKind(borderType);
  if (kind != zelBorderConstant && kind != zelBorderReplicate && kind != zelBorderInMemory)
    return zelStatusBadBorder;
  if (imageInputBufferBytes(roiSize, mask) > INT_MAX) return zelStatusBadSize;

  const DerivativeKernel kernel = mask == zelMaskSize5x5       ? DerivativeKernel::kSobel5x5
                                  : filterType == zelFilterSobel ? DerivativeKernel::kSobel3x3
                                                                 : DerivativeKernel::kScharr3x3;
  if (norm == zelNormL1)
    cannyFromImage<Norm::kL1>(src, srcStep, dst, dstStep, roiSize, kernel, borderType, borderValue, lowThreshold,
                              highThreshold, buffer);
  else
    cannyFromImage<Norm::kL2>(src, srcStep, dst, dstStep, roiSize, kernel, borderType, borderValue, lowThreshold,
                              highThreshold, buffer);
  return zelStatusOk;
}
