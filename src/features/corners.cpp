// Corner measures: the smaller eigenvalue, both eigenvalues and vectors, and
// the Harris response of the gradient covariance summed over a block. The
// image streams through: each output row needs the products of the block's
// rows, kept in a small cache of product rows keyed by image row (a border
// may map several window rows to one image row, or to a far one).
#include <emmintrin.h>

#include <cfloat>
#include <climits>
#include <cmath>
#include <cstring>

#include "core/alloc.h"
#include "core/status.h"
#include "features/corners_kernels.h"
#include "filter/border.h"
#include "filter/derivative.h"

namespace zelcv {
namespace {

using corners::Measure;

constexpr int kMaxBlock = 31;

ZelStatus checkWindow(int mask, int blockSize) {
  if (mask != zelMaskSize3x3 && mask != zelMaskSize5x5) return zelStatusBadMaskSize;
  if (blockSize < 1 || blockSize > kMaxBlock) return zelStatusBadMaskSize;
  return zelStatusOk;
}

ZelStatus cornerQuery(ZeliSize roi, int mask, int blockSize, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roi, bufferSize)) return s;
  if (ZelStatus s = checkWindow(mask, blockSize)) return s;
  const int64_t bytes = corners::bufferBytes(roi.width, blockSize);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

bool borderAccepted(ZeliBorderType border) {
  switch (border) {
    case zelBorderConstant:
    case zelBorderReplicate:
    case zelBorderWrap:
    case zelBorderMirror:
    case zelBorderMirrorWithEdge:
      return true;
    default:
      return false;
  }
}

DerivativeKernel kernelOf(int filterType, int mask) {
  if (mask == zelMaskSize5x5) return DerivativeKernel::kSobel5x5;
  return filterType == zelFilterScharr ? DerivativeKernel::kScharr3x3 : DerivativeKernel::kSobel3x3;
}

// The derivative scale: 1 / (2^(K-1) B), Scharr 1 / (8 B), and 1/255 more for
// 8-bit sources, computed in double and rounded once.
float derivativeScale(DerivativeKernel kernel, int blockSize, bool eightBit) {
  double d = kernel == DerivativeKernel::kSobel5x5 ? 16.0 : kernel == DerivativeKernel::kScharr3x3 ? 8.0 : 4.0;
  d *= blockSize;
  if (eightBit) d *= 255.0;
  return float(1.0 / d);
}

// Gradient sources in float: 8-bit through the integer engine, 32f through
// its float counterpart.
struct Gradient8u {
  DerivativeRows rows;
  Zel16s* dx16;
  Zel16s* dy16;
  void row(int y, float* fx, float* fy, float scale) const {
    rows.row(y, dx16, dy16);
    corners::scaleRow16(dx16, dy16, scale, fx, fy, width);
  }
  int width;
};

struct Gradient32f {
  DerivativeRows32f rows;
  int width;
  void row(int y, float* fx, float* fy, float scale) const {
    rows.row(y, fx, fy);
    corners::scaleRow32(fx, fy, scale, width);
  }
};

template <typename T>
ZelStatus checkCorner(const T* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roi, int dstChannels,
                      int filterType, int mask, int blockSize, ZeliBorderType border, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep, dstChannels)}, roi, {buffer})) return s;
  if ((filterType != zelFilterSobel && filterType != zelFilterScharr) ||
      (filterType == zelFilterScharr && mask != zelMaskSize3x3))
    return zelStatusBadMaskSize;
  if (ZelStatus s = checkWindow(mask, blockSize)) return s;
  if (!borderAccepted(border)) return zelStatusBadBorder;
  if (corners::bufferBytes(roi.width, blockSize) > INT_MAX) return zelStatusBadSize;
  return zelStatusOk;
}

Gradient8u gradientOf(const Zel8u* src, int srcStep, ZeliSize roi, DerivativeKernel kernel, ZeliBorderType border,
                      Zel8u borderValue, const corners::Workspace& ws) {
  Zel16s* dx16 = reinterpret_cast<Zel16s*>(ws.gradientScratch);
  Zel16s* dy16 = dx16 + roi.width;
  return Gradient8u{DerivativeRows(src, srcStep, roi, kernel, border, borderValue, dy16 + roi.width), dx16, dy16,
                    roi.width};
}

Gradient32f gradientOf(const Zel32f* src, int srcStep, ZeliSize roi, DerivativeKernel kernel,
                       ZeliBorderType border, Zel32f borderValue, const corners::Workspace& ws) {
  return Gradient32f{DerivativeRows32f(src, srcStep, roi, kernel, border, borderValue, ws.gradientScratch),
                     roi.width};
}

template <typename T>
ZelStatus cornerFrom(const T* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roi, int filterType, int mask,
                     int blockSize, ZeliBorderType border, T borderValue, Zel8u* buffer,
                     const corners::Response& response) {
  const int dstChannels = response.measure == Measure::kEigenValsVecs ? 6 : 1;
  if (ZelStatus s = checkCorner(src, srcStep, dst, dstStep, roi, dstChannels, filterType, mask, blockSize, border,
                                buffer))
    return s;
  if (!std::isfinite(response.k)) return zelStatusBadArgument;
  const DerivativeKernel kernel = kernelOf(filterType, mask);
  corners::Workspace ws(buffer, roi.width, blockSize);
  const auto gradient = gradientOf(src, srcStep, roi, kernel, border, borderValue, ws);
  corners::run(gradient, ws, roi, blockSize, border, derivativeScale(kernel, blockSize, sizeof(T) == 1), response,
               dst, dstStep);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

#define ZELCV_CORNER_QUERY(name)                                                          \
  ZELCV_ENTRY(name)(ZeliSize roiSize, int mask, int blockSize, int* bufferSize) {         \
    return cornerQuery(roiSize, mask, blockSize, bufferSize);                             \
  }
ZELCV_CORNER_QUERY(zeliMinEigenValGetBufferSize_8u32f_C1R)
ZELCV_CORNER_QUERY(zeliMinEigenValGetBufferSize_32f_C1R)
ZELCV_CORNER_QUERY(zeliEigenValsVecsGetBufferSize_8u32f_C1R)
ZELCV_CORNER_QUERY(zeliEigenValsVecsGetBufferSize_32f_C1R)
ZELCV_CORNER_QUERY(zeliHarrisCornerGetBufferSize)

ZELCV_ENTRY(zeliMinEigenVal_8u32f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                       int filterType, int mask, int blockSize, ZeliBorderType borderType,
                                       Zel8u borderValue, Zel8u* buffer) {
  return cornerFrom(src, srcStep, dst, dstStep, roiSize, filterType, mask, blockSize, borderType, borderValue,
                    buffer, {Measure::kMinEigenVal, 0.0f});
}
ZELCV_ENTRY(zeliMinEigenVal_32f_C1R)(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                     int filterType, int mask, int blockSize, ZeliBorderType borderType,
                                     Zel32f borderValue, Zel8u* buffer) {
  return cornerFrom(src, srcStep, dst, dstStep, roiSize, filterType, mask, blockSize, borderType, borderValue,
                    buffer, {Measure::kMinEigenVal, 0.0f});
}
ZELCV_ENTRY(zeliEigenValsVecs_8u32f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                         int filterType, int mask, int blockSize, ZeliBorderType borderType,
                                         Zel8u borderValue, Zel8u* buffer) {
  return cornerFrom(src, srcStep, dst, dstStep, roiSize, filterType, mask, blockSize, borderType, borderValue,
                    buffer, {Measure::kEigenValsVecs, 0.0f});
}
ZELCV_ENTRY(zeliEigenValsVecs_32f_C1R)(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                       int filterType, int mask, int blockSize, ZeliBorderType borderType,
                                       Zel32f borderValue, Zel8u* buffer) {
  return cornerFrom(src, srcStep, dst, dstStep, roiSize, filterType, mask, blockSize, borderType, borderValue,
                    buffer, {Measure::kEigenValsVecs, 0.0f});
}
ZELCV_ENTRY(zeliHarrisCorner_8u32f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                        int filterType, int mask, int blockSize, Zel32f k, ZeliBorderType borderType,
                                        Zel8u borderValue, Zel8u* buffer) {
  return cornerFrom(src, srcStep, dst, dstStep, roiSize, filterType, mask, blockSize, borderType, borderValue,
                    buffer, {Measure::kHarris, k});
}
ZELCV_ENTRY(zeliHarrisCorner_32f_C1R)(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                      int filterType, int mask, int blockSize, Zel32f k, ZeliBorderType borderType,
                                      Zel32f borderValue, Zel8u* buffer) {
  return cornerFrom(src, srcStep, dst, dstStep, roiSize, filterType, mask, blockSize, borderType, borderValue,
                    buffer, {Measure::kHarris, k});
}
