// Standard deviation over a sliding upright or tilted rectangle, from an
// integral and a squared integral.
#include <cmath>

#include "detect/integral_checks.h"
#include "detect/rect_stddev.h"

namespace zelcv {
namespace {

using rectstd::Corners;
using rectstd::Moments;

// A corner relative to the rectangle's anchor (rect.x, rect.y).
struct Offset {
  int dx, dy;
};

enum class Shape { Upright, Tilted };

// Offsets of the corners tl, tr, bl, br. For a tilted rectangle they are
// top, right, left and bottom, so that the same S = (tl - tr) + (br - bl)
// holds.
inline void cornerOffsets(Shape shape, const ZeliRect& r, Offset out[4]) {
  if (shape == Shape::Upright) {
    out[0] = {0, 0};
    out[1] = {r.width, 0};
    out[2] = {0, r.height};
    out[3] = {r.width, r.height};
  } else {
    out[0] = {0, 0};
    out[1] = {r.width, r.width};
    out[2] = {-r.height, r.height};
    out[3] = {r.width - r.height, r.width + r.height};
  }
}

template <typename T>
Corners<T> cornersAt(const T* base, int step, const ZeliRect& r, const Offset off[4], int y) {
  auto at = [&](const Offset& o) { return rowAt(base, step, int64_t(y) + r.y + o.dy) + r.x + o.dx; };
  return {at(off[0]), at(off[1]), at(off[2]), at(off[3])};
}

// Pointers, size, steps (the integrals must reach w + rect.x + rect.width
// columns), alignment, and only then the rectangle itself.
template <class Sum, class Sq, class Out, Moments M = Moments::MeanSquare>
ZelStatus rectStdDev(Shape shape, const typename Sum::T* src, int srcStep,
                     const typename Sq::T* sqr, int sqrStep, typename Out::T* dst, int dstStep,
                     ZeliSize roi, ZeliRect rect, int scaleFactor) {
  const int64_t cols = int64_t(roi.width) + rect.x + rect.width;
  if (ZelStatus s = checkIntegralArgs({src, sqr, dst}, roi,
                                      {stepNeed<typename Sum::T>(srcStep, cols),
                                       stepNeed<typename Out::T>(dstStep, roi.width),
                                       stepNeed<typename Sq::T>(sqrStep, cols)}))
    return s;
  if (rect.x < 0 || rect.y < 0 || rect.width < 1 || rect.height < 1) return zelStatusBadSize;
  if (shape == Shape::Tilted && rect.x < rect.height) return zelStatusBadSize;

  int64_t pixels = int64_t(rect.width) * rect.height * (shape == Shape::Tilted ? 2 : 1);
  // The floating results take the count as a single-precision value; the
  // scaled integer result keeps it exact.
  double n = M == Moments::MeanSquare ? double(float(pixels)) : double(pixels);
  double inv = 1.0 / n;
  // Clamped so that the scale stays finite: 0 x scale must stay 0.
  double scale = std::ldexp(1.0, -(scaleFactor < -1023 ? -1023 : scaleFactor));

  Offset off[4];
  cornerOffsets(shape, rect, off);
  for (int y = 0; y < roi.height; ++y)
    rectstd::stdDevRow<Sum, Sq, Out, M>(cornersAt(src, srcStep, rect, off, y),
                                        cornersAt(sqr, sqrStep, rect, off, y),
                                        rowAt(dst, dstStep, y), roi.width, inv, n, scale, true);
  return zelStatusOk;
}

using rectstd::Out32f;
using rectstd::Out32sScaled;
using rectstd::Sum32f;
using rectstd::Sum32s;
using rectstd::SumSq32u;
using rectstd::SumSq64f;

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliRectStdDev_32f_C1R)(const Zel32f* src, int srcStep, const Zel64f* sqr, int sqrStep,
                                    Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliRect rect) {
  return rectStdDev<Sum32f, SumSq64f, Out32f>(Shape::Upright, src, srcStep, sqr, sqrStep, dst,
                                              dstStep, roiSize, rect, 0);
}

ZELCV_ENTRY(zeliRectStdDev_32s32f_C1R)(const Zel32s* src, int srcStep, const Zel64f* sqr,
                                       int sqrStep, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                       ZeliRect rect) {
  return rectStdDev<Sum32s, SumSq64f, Out32f>(Shape::Upright, asUnsigned(src), srcStep, sqr,
                                              sqrStep, dst, dstStep, roiSize, rect, 0);
}

ZELCV_ENTRY(zeliRectStdDev_32s_C1RSfs)(const Zel32s* src, int srcStep, const Zel32s* sqr,
                                       int sqrStep, Zel32s* dst, int dstStep, ZeliSize roiSize,
                                       ZeliRect rect, int scaleFactor) {
  return rectStdDev<Sum32s, SumSq32u, Out32sScaled, Moments::Numerator>(Shape::Upright, asUnsigned(src), srcStep,
                                                    asUnsigned(sqr), sqrStep, dst, dstStep,
                                                    roiSize, rect, scaleFactor);
}

ZELCV_ENTRY(zeliTiltedRectStdDev_32f_C1R)(const Zel32f* src, int srcStep, const Zel64f* sqr,
                                          int sqrStep, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                          ZeliRect rect) {
  return rectStdDev<Sum32f, SumSq64f, Out32f>(Shape::Tilted, src, srcStep, sqr, sqrStep, dst,
                                              dstStep, roiSize, rect, 0);
}

ZELCV_ENTRY(zeliTiltedRectStdDev_32s32f_C1R)(const Zel32s* src, int srcStep, const Zel64f* sqr,
                                             int sqrStep, Zel32f* dst, int dstStep,
                                             ZeliSize roiSize, ZeliRect rect) {
  return rectStdDev<Sum32s, SumSq64f, Out32f>(Shape::Tilted, asUnsigned(src), srcStep, sqr,
                                              sqrStep, dst, dstStep, roiSize, rect, 0);
}

ZELCV_ENTRY(zeliTiltedRectStdDev_32s_C1RSfs)(const Zel32s* src, int srcStep, const Zel32s* sqr,
                                             int sqrStep, Zel32s* dst, int dstStep,
                                             ZeliSize roiSize, ZeliRect rect, int scaleFactor) {
  return rectStdDev<Sum32s, SumSq32u, Out32sScaled, Moments::Numerator>(Shape::Tilted, asUnsigned(src), srcStep,
                                                    asUnsigned(sqr), sqrStep, dst, dstStep,
                                                    roiSize, rect, scaleFactor);
}
