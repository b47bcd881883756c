// Plain and squared integral images.
#include <algorithm>
#include <type_traits>

#include "detect/integral_checks.h"
#include "kernels/dispatch.h"
#include "kernels/integral.h"

namespace zelcv {
namespace {

using integral::NoPlane;
using integral::Plane32f;
using integral::Plane32s;
using integral::Plane64f;

// Fills row 0 and column 0 with the start values, then builds row y + 1 from
// source row y and row y. Sums-only rows run on the instruction set Isa.
template <class Sum, class Sq, class Isa>
void integralImage(const uint8_t* src, int srcStep, typename Sum::T* dst, int dstStep,
                   typename Sq::T* sq, int sqStep, ZeliSize roi, typename Sum::T val,
                   typename Sq::T valSqr) {
  constexpr bool kSquares = !std::is_same<Sq, NoPlane>::value;
  const int w = roi.width;
  std::fill_n(dst, w + 1, val);
  if (kSquares) std::fill_n(sq, w + 1, valSqr);
  for (int y = 0; y < roi.height; ++y) {
    const typename Sum::T* above = rowAt(dst, dstStep, y);
    typename Sum::T* out = rowAt(dst, dstStep, y + 1);
    const typename Sq::T* aboveSq = nullptr;
    typename Sq::T* outSq = nullptr;
    out[0] = val;
    if (kSquares) {
      aboveSq = rowAt(sq, sqStep, y) + 1;
      outSq = rowAt(sq, sqStep, y + 1);
      outSq[0] = valSqr;
      ++outSq;
    }
    if constexpr (kSquares)
      integral::integralRow<Sum, Sq>(rowAt(src, srcStep, y), above + 1, out + 1, aboveSq, outSq, w,
                                     true);
    else
      integral::sumRow<Sum, Isa>(rowAt(src, srcStep, y), above + 1, out + 1, w);
  }
}

template <class Sum>
ZelStatus plainIntegral(const Zel8u* src, int srcStep, typename Sum::T* dst, int dstStep,
                        ZeliSize roi, typename Sum::T val) {
  if (ZelStatus s = check8uIntegral(src, srcStep, dst, dstStep, roi, 1)) return s;
  withChosenIsa<IsaLevel::Avx2>([&](auto isa) {
    integralImage<Sum, NoPlane, typename decltype(isa)::Isa>(src, srcStep, dst, dstStep, nullptr, 0, roi, val, 0);
  });
  return zelStatusOk;
}

template <class Sum, class Sq>
ZelStatus sqrIntegral(const Zel8u* src, int srcStep, typename Sum::T* dst, int dstStep,
                      typename Sq::T* sqr, int sqrStep, ZeliSize roi, typename Sum::T val,
                      typename Sq::T valSqr) {
  if (ZelStatus s = check8uIntegral(src, srcStep, dst, dstStep, sqr, sqrStep, roi, 1)) return s;
  integralImage<Sum, Sq, simd::Sse2>(src, srcStep, dst, dstStep, sqr, sqrStep, roi, val, valSqr);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliIntegral_8u32s_C1R)(const Zel8u* src, int srcStep, Zel32s* dst, int dstStep,
                                    ZeliSize roiSize, Zel32s val) {
  return plainIntegral<Plane32s>(src, srcStep, asUnsigned(dst), dstStep, roiSize, uint32_t(val));
}

ZELCV_ENTRY(zeliIntegral_8u32f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                    ZeliSize roiSize, Zel32f val) {
  return plainIntegral<Plane32f>(src, srcStep, dst, dstStep, roiSize, val);
}

ZELCV_ENTRY(zeliIntegral_32f_C1R)(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                                  ZeliSize roiSize) {
  if (ZelStatus s = checkIntegralArgs({src, dst}, roiSize,
                                      {stepNeed<Zel32f>(srcStep, roiSize.width),
                                       stepNeed<Zel32f>(dstStep, int64_t(roiSize.width) + 1)}))
    return s;
  std::fill_n(dst, roiSize.width + 1, 0.0f);
  for (int y = 0; y < roiSize.height; ++y) {
    Zel32f* out = rowAt(dst, dstStep, y + 1);
    out[0] = 0.0f;
    integral::integralRow32f(rowAt(src, srcStep, y), rowAt(dst, dstStep, y) + 1, out + 1,
                             roiSize.width, true);
  }
  return zelStatusOk;
}

ZELCV_ENTRY(zeliSqrIntegral_8u32s_C1R)(const Zel8u* src, int srcStep, Zel32s* dst, int dstStep,
                                       Zel32s* sqr, int sqrStep, ZeliSize roiSize, Zel32s val,
                                       Zel32s valSqr) {
  return sqrIntegral<Plane32s, Plane32s>(src, srcStep, asUnsigned(dst), dstStep, asUnsigned(sqr),
                                         sqrStep, roiSize, uint32_t(val), uint32_t(valSqr));
}

ZELCV_ENTRY(zeliSqrIntegral_8u32s64f_C1R)(const Zel8u* src, int srcStep, Zel32s* dst, int dstStep,
                                          Zel64f* sqr, int sqrStep, ZeliSize roiSize, Zel32s val,
                                          Zel64f valSqr) {
  return sqrIntegral<Plane32s, Plane64f>(src, srcStep, asUnsigned(dst), dstStep, sqr, sqrStep,
                                         roiSize, uint32_t(val), valSqr);
}

ZELCV_ENTRY(zeliSqrIntegral_8u32f64f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                          Zel64f* sqr, int sqrStep, ZeliSize roiSize, Zel32f val,
                                          Zel64f valSqr) {
  return sqrIntegral<Plane32f, Plane64f>(src, srcStep, dst, dstStep, sqr, sqrStep, roiSize, val,
                                         valSqr);
}
