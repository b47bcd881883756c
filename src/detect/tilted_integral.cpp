// Tilted (45-degree) integral images, alone and with tilted squares.
#include <algorithm>

#include "detect/integral_checks.h"
#include "kernels/integral.h"

namespace zelcv {
namespace {

using integral::Tilt32f;
using integral::Tilt32s;
using integral::Tilt64f;
using integral::TiltEdge;

// Rows 0 and 1 hold the start value; row n = y + 2 comes from rows n - 1,
// n - 2 and source row y.
template <class Plane, bool Square>
void tiltedImage(const uint8_t* src, int srcStep, typename Plane::T* dst, int dstStep, ZeliSize roi,
                 typename Plane::T val, TiltEdge edge) {
  const int w = roi.width;
  std::fill_n(dst, w + 2, val);
  std::fill_n(rowAt(dst, dstStep, 1), w + 2, val);
  for (int y = 0; y < roi.height; ++y)
    integral::tiltedRow<Plane, Square>(rowAt(src, srcStep, y), rowAt(dst, dstStep, y + 1),
                                       rowAt(dst, dstStep, y), rowAt(dst, dstStep, y + 2), w, edge,
                                       true);
}

template <class Plane>
ZelStatus tiltedIntegral(const Zel8u* src, int srcStep, typename Plane::T* dst, int dstStep,
                         ZeliSize roi, typename Plane::T val, TiltEdge edge) {
  if (ZelStatus s = check8uIntegral(src, srcStep, dst, dstStep, roi, 2)) return s;
  tiltedImage<Plane, false>(src, srcStep, dst, dstStep, roi, val, edge);
  return zelStatusOk;
}

// Sums and squares both read the pixel right of the ROI in every row.
template <class Sum, class Sq>
ZelStatus tiltedSqrIntegral(const Zel8u* src, int srcStep, typename Sum::T* dst, int dstStep,
                            typename Sq::T* sqr, int sqrStep, ZeliSize roi, typename Sum::T val,
                            typename Sq::T valSqr) {
  if (ZelStatus s = check8uIntegral(src, srcStep, dst, dstStep, sqr, sqrStep, roi, 2)) return s;
  tiltedImage<Sum, false>(src, srcStep, dst, dstStep, roi, val, TiltEdge::ReadRight);
  tiltedImage<Sq, true>(src, srcStep, sqr, sqrStep, roi, valSqr, TiltEdge::ReadRight);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliTiltedIntegral_8u32f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                          ZeliSize roiSize, Zel32f val) {
  return tiltedIntegral<Tilt32f>(src, srcStep, dst, dstStep, roiSize, val, TiltEdge::AddPrevious);
}

ZELCV_ENTRY(zeliTiltedIntegral_8u32s_C1R)(const Zel8u* src, int srcStep, Zel32s* dst, int dstStep,
                                          ZeliSize roiSize, Zel32s val) {
  return tiltedIntegral<Tilt32s>(src, srcStep, asUnsigned(dst), dstStep, roiSize, uint32_t(val),
                                 TiltEdge::Clear);
}

ZELCV_ENTRY(zeliTiltedSqrIntegral_8u32s_C1R)(const Zel8u* src, int srcStep, Zel32s* dst,
                                             int dstStep, Zel32s* sqr, int sqrStep,
                                             ZeliSize roiSize, Zel32s val, Zel32s valSqr) {
  return tiltedSqrIntegral<Tilt32s, Tilt32s>(src, srcStep, asUnsigned(dst), dstStep,
                                             asUnsigned(sqr), sqrStep, roiSize, uint32_t(val),
                                             uint32_t(valSqr));
}

ZELCV_ENTRY(zeliTiltedSqrIntegral_8u32s64f_C1R)(const Zel8u* src, int srcStep, Zel32s* dst,
                                                int dstStep, Zel64f* sqr, int sqrStep,
                                                ZeliSize roiSize, Zel32s val, Zel64f valSqr) {
  return tiltedSqrIntegral<Tilt32s, Tilt64f>(src, srcStep, asUnsigned(dst), dstStep, sqr, sqrStep,
                                             roiSize, uint32_t(val), valSqr);
}

ZELCV_ENTRY(zeliTiltedSqrIntegral_8u32f64f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst,
                                                int dstStep, Zel64f* sqr, int sqrStep,
                                                ZeliSize roiSize, Zel32f val, Zel64f valSqr) {
  return tiltedSqrIntegral<Tilt32f, Tilt64f>(src, srcStep, dst, dstStep, sqr, sqrStep, roiSize, val,
                                             valSqr);
}
