// Derivative and box filters of 8-bit images: Sobel, Scharr and Laplacian
// into 16s (exact) and 8s (scaled), and the 8-bit box lowpass. All run on the
// integer engine of derivative_kernels.h, which the Canny detector shares.
#include <emmintrin.h>
#include <limits.h>
#include <string.h>

#include <type_traits>

#include "core/alloc.h"
#include "core/status.h"
#include "filter/derivative_ops.h"
#include "filter/filters_common.h"

namespace zelcv {
namespace {

using deriv::FilterSink;

template <class K, class Out>
void runKernel(const Zel8u* src, int srcStep, typename Out::T* dst, int dstStep, ZeliSize roi, ZeliBorderType border,
               Zel8u borderValue, Zel8u* buffer) {
  const size_t columns = deriv::scratchColumns(roi.width, K::kRadius);
  Zel16s* a = reinterpret_cast<Zel16s*>(alignUp(buffer, 16));
  Zel16s* b = a + columns;
  Zel8u* constantRow = reinterpret_cast<Zel8u*>(b + columns);
  if (borderKind(border) == zelBorderConstant) memset(constantRow, borderValue, size_t(roi.width));
  const deriv::SourceRows rows{src, srcStep, roi, border, borderValue, constantRow};
  for (int y = 0; y < roi.height; ++y) {
    auto* out = reinterpret_cast<typename Out::T*>(reinterpret_cast<uint8_t*>(dst) + ptrdiff_t(y) * dstStep);
    deriv::engineRow(rows, y, a, b, FilterSink<K, Out>{out});
  }
}

// The common checks, then the mask and the border.
template <typename D>
ZelStatus checkFilter(const Zel8u* src, int srcStep, const D* dst, int dstStep, ZeliSize roi, int mask, bool has5x5,
                      ZeliBorderType border, const Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep)}, roi, {buffer})) return s;
  if (ZelStatus s = filters::checkMask(mask, has5x5)) return s;
  if (ZelStatus s = filters::checkBorder(border)) return s;
  if (filters::integerBufferBytes(roi.width) > INT_MAX) return zelStatusBadSize;
  return zelStatusOk;
}

enum class Result { k16s, k8s };

using deriv::To16s;
using deriv::To8s;

template <class Op, Result R, typename D>
ZelStatus derivative(const Zel8u* src, int srcStep, D* dst, int dstStep, ZeliSize roi, int mask, ZeliBorderType border,
                     Zel8u borderValue, Zel8u* buffer) {
  constexpr bool kHas5x5 = !std::is_void<typename Op::K5>::value;
  if (ZelStatus s = checkFilter(src, srcStep, dst, dstStep, roi, mask, kHas5x5, border, buffer)) return s;
  if constexpr (R == Result::k16s) {
    if constexpr (kHas5x5)
      if (mask == zelMaskSize5x5)
        return runKernel<typename Op::K5, To16s>(src, srcStep, dst, dstStep, roi, border, borderValue, buffer),
               zelStatusOk;
    runKernel<typename Op::K3, To16s>(src, srcStep, dst, dstStep, roi, border, borderValue, buffer);
  } else {
    if constexpr (kHas5x5)
      if (mask == zelMaskSize5x5)
        return runKernel<typename Op::K5, To8s<Op::kShift5>>(src, srcStep, dst, dstStep, roi, border, borderValue,
                                                             buffer),
               zelStatusOk;
    runKernel<typename Op::K3, To8s<Op::kShift3>>(src, srcStep, dst, dstStep, roi, border, borderValue, buffer);
  }
  return zelStatusOk;
}

ZelStatus lowpass(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roi, int mask,
                  ZeliBorderType border, Zel8u borderValue, Zel8u* buffer) {
  if (ZelStatus s = checkFilter(src, srcStep, dst, dstStep, roi, mask, true, border, buffer)) return s;
  if (mask == zelMaskSize5x5)
    runKernel<deriv::Box5x5, deriv::Mean25>(src, srcStep, dst, dstStep, roi, border, borderValue, buffer);
  else
    runKernel<deriv::Box3x3, deriv::Mean9>(src, srcStep, dst, dstStep, roi, border, borderValue, buffer);
  return zelStatusOk;
}

ZelStatus integerQuery(ZeliSize roi, int mask, bool has5x5, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roi, bufferSize)) return s;
  if (ZelStatus s = filters::checkMask(mask, has5x5)) return s;
  const int64_t bytes = filters::integerBufferBytes(roi.width);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

#define ZELCV_DERIVATIVE(name, suffix, Op, R, D)                                                                  \
  ZELCV_ENTRY(zeliFilter##name##Border_##suffix)(const Zel8u* src, int srcStep, D* dst, int dstStep,              \
                                                 ZeliSize roiSize, int maskSize, ZeliBorderType borderType,       \
                                                 Zel8u borderValue, Zel8u* buffer) {                              \
    return derivative<Op, Result::R>(src, srcStep, dst, dstStep, roiSize, maskSize, borderType, borderValue,     \
                                     buffer);                                                                     \
  }

ZELCV_DERIVATIVE(SobelHoriz, 8u8s_C1R, deriv::SobelHoriz, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelVert, 8u8s_C1R, deriv::SobelVert, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelNegVert, 8u16s_C1R, deriv::SobelNegVert, k16s, Zel16s)
ZELCV_DERIVATIVE(SobelNegVert, 8u8s_C1R, deriv::SobelNegVert, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelHorizSecond, 8u16s_C1R, deriv::SobelHorizSecond, k16s, Zel16s)
ZELCV_DERIVATIVE(SobelHorizSecond, 8u8s_C1R, deriv::SobelHorizSecond, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelVertSecond, 8u16s_C1R, deriv::SobelVertSecond, k16s, Zel16s)
ZELCV_DERIVATIVE(SobelVertSecond, 8u8s_C1R, deriv::SobelVertSecond, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelCross, 8u16s_C1R, deriv::SobelCross, k16s, Zel16s)
ZELCV_DERIVATIVE(SobelCross, 8u8s_C1R, deriv::SobelCross, k8s, Zel8s)
ZELCV_DERIVATIVE(ScharrHoriz, 8u16s_C1R, deriv::ScharrHoriz, k16s, Zel16s)
ZELCV_DERIVATIVE(ScharrHoriz, 8u8s_C1R, deriv::ScharrHoriz, k8s, Zel8s)
ZELCV_DERIVATIVE(ScharrVert, 8u16s_C1R, deriv::ScharrVert, k16s, Zel16s)
ZELCV_DERIVATIVE(ScharrVert, 8u8s_C1R, deriv::ScharrVert, k8s, Zel8s)
ZELCV_DERIVATIVE(Laplacian, 8u16s_C1R, deriv::Laplacian, k16s, Zel16s)
ZELCV_DERIVATIVE(Laplacian, 8u8s_C1R, deriv::Laplacian, k8s, Zel8s)

ZELCV_ENTRY(zeliFilterLowpassBorder_8u_C1R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                            int maskSize, ZeliBorderType borderType, Zel8u borderValue,
                                            Zel8u* buffer) {
  return lowpass(src, srcStep, dst, dstStep, roiSize, maskSize, borderType, borderValue, buffer);
}

// The queries of the 8-bit members come in alias groups; every group gives
// the same formula, and the Scharr groups refuse the 5x5 mask.
ZELCV_SHARED_ENTRY(filterDerivativeBufferSize8u16s)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return integerQuery(roiSize, maskSize, true, bufferSize);
}
ZELCV_SHARED_ENTRY(filterSobelBufferSize8u8s)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return integerQuery(roiSize, maskSize, true, bufferSize);
}
ZELCV_SHARED_ENTRY(filterScharrBufferSize8u)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return integerQuery(roiSize, maskSize, false, bufferSize);
}
ZELCV_ENTRY(zeliFilterScharrVertGetBufferSize_8u16s_C1R)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return integerQuery(roiSize, maskSize, false, bufferSize);
}
ZELCV_ENTRY(zeliFilterLaplacianGetBufferSize_8u16s_C1R)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return integerQuery(roiSize, maskSize, true, bufferSize);
}
ZELCV_ENTRY(zeliFilterLaplacianGetBufferSize_8u8s_C1R)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return integerQuery(roiSize, maskSize, true, bufferSize);
}
