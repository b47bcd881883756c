// Pyramid size queries and the pyramid record.
#include <limits.h>
#include <string.h>

#include "core/alloc.h"
#include "core/status.h"
#include "filter/pyramid_sizes.h"

using zelcv::pyr::downSize;
using zelcv::pyr::rateValid;

ZELCV_ENTRY(zeliGetPyramidDownROI)(ZeliSize srcRoi, ZeliSize* dstRoi, Zel32f rate) {
  if (!dstRoi) return zelStatusNullPointer;
  if (ZelStatus s = zelcv::checkSize(srcRoi)) return s;
  if (!rateValid(rate)) return zelStatusBadArgument;
  *dstRoi = downSize(srcRoi, rate);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliGetPyramidUpROI)(ZeliSize srcRoi, ZeliSize* dstRoiMin, ZeliSize* dstRoiMax, Zel32f rate) {
  if (!dstRoiMin || !dstRoiMax) return zelStatusNullPointer;
  if (ZelStatus s = zelcv::checkSize(srcRoi)) return s;
  if (!rateValid(rate)) return zelStatusBadArgument;
  using zelcv::pyr::upMax;
  using zelcv::pyr::upMin;
  const int64_t maxW = upMax(srcRoi.width, rate), maxH = upMax(srcRoi.height, rate);
  // The largest sizes bound the smallest ones.
  if (maxW > INT_MAX || maxH > INT_MAX) return zelStatusBadSize;
  *dstRoiMin = {int(upMin(srcRoi.width, rate)), int(upMin(srcRoi.height, rate))};
  *dstRoiMax = {int(maxW), int(maxH)};
  return zelStatusOk;
}

namespace {

constexpr int64_t align8(int64_t n) { return (n + 7) & ~int64_t(7); }

}  // namespace

// One block: the record, then the image pointers, sizes, scales and steps,
// each at an 8-byte-aligned offset.
ZELCV_ENTRY(zeliPyramidInitAlloc)(ZeliPyramid** pyramid, int level, ZeliSize roiSize, Zel32f rate) {
  if (!pyramid) return zelStatusNullPointer;
  if (ZelStatus s = zelcv::checkSize(roiSize)) return s;
  if (!rateValid(rate) || level < 1) return zelStatusBadArgument;
  const int64_t top = zelcv::pyr::levelCount(roiSize, rate, level);
  const int64_t n = top + 1;
  const int64_t imagesAt = align8(sizeof(ZeliPyramid));
  const int64_t sizesAt = align8(imagesAt + n * int64_t(sizeof(Zel8u*)));
  const int64_t scalesAt = align8(sizesAt + n * int64_t(sizeof(ZeliSize)));
  const int64_t stepsAt = align8(scalesAt + n * int64_t(sizeof(Zel64f)));
  const int64_t total = stepsAt + n * int64_t(sizeof(int));
  uint8_t* block = total > INT_MAX ? nullptr : static_cast<uint8_t*>(zelcv::allocBytes(int(total)));
  if (!block) return zelStatusOutOfMemory;
  memset(block, 0, size_t(total));
  ZeliPyramid* p = reinterpret_cast<ZeliPyramid*>(block);
  p->images = reinterpret_cast<Zel8u**>(block + imagesAt);
  p->roiSizes = reinterpret_cast<ZeliSize*>(block + sizesAt);
  p->scales = reinterpret_cast<Zel64f*>(block + scalesAt);
  p->steps = reinterpret_cast<int*>(block + stepsAt);
  p->layerState = nullptr;
  p->level = int(top);
  const double inverse = 1.0 / double(rate);
  p->roiSizes[0] = roiSize;
  p->scales[0] = 1.0;
  for (int64_t i = 1; i < n; ++i) {
    p->roiSizes[i] = downSize(p->roiSizes[i - 1], rate);
    p->scales[i] = p->scales[i - 1] * inverse;
  }
  for (int64_t i = 0; i < n; ++i) p->images[i] = nullptr;
  *pyramid = p;
  return zelStatusOk;
}
