// Derivative and box filters of 8-bit images: Sobel, Scharr and Laplacian
// into 16s (exact) and 8s (scaled), and the 8-bit box lowpass. All run on the
// integer engine of derivative_kernels.h, which the Canny detector shares.
#include <emmintrin.h>
#include <limits.h>
#include <string.h>

#include <type_traits>

#include "core/alloc.h"
#include "core/status.h"
#include "filter/derivative_kernels.h"
#include "filter/filters_common.h"

namespace zelcv {
namespace {

using deriv::NoTaps;
using deriv::ScalarOps;
using deriv::Taps;
using deriv::VectorOps;

template <class Ops> constexpr bool kVector = std::is_same<Ops, VectorOps>::value;

// ---- output conversions ------------------------------------------------------

struct To16s {  // the exact sum
  using T = Zel16s;
  template <class Ops> static void store(T* p, typename Ops::V v) {
    if constexpr (kVector<Ops>)
      _mm_storeu_si128(reinterpret_cast<__m128i*>(p), v);
    else
      *p = T(v);
  }
};

// floor(v / 2^S + 1/2), saturated to -128 .. 127. |v| + 2^(S-1) stays inside
// 16 bits for every kernel.
template <int S>
struct To8s {
  using T = Zel8s;
  template <class Ops> static void store(T* p, typename Ops::V v) {
    if constexpr (kVector<Ops>) {
      const __m128i r = _mm_srai_epi16(_mm_add_epi16(v, _mm_set1_epi16(1 << (S - 1))), S);
      _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packs_epi16(r, r));
    } else {
      const int r = (v + (1 << (S - 1))) >> S;
      *p = T(r < -128 ? -128 : r > 127 ? 127 : r);
    }
  }
};

// (v + N/2) / N for 0 <= v <= 255 N: the mean of N pixels rounded to nearest
// (N is odd, so no exact halves). The vector form multiplies by M / 2^(16+S),
// which equals the division over that range (checked at compile time).
template <int N, int M, int S>
struct Mean {
  using T = Zel8u;
  static constexpr bool exact() {
    for (int v = 0; v <= 255 * N + N / 2; ++v)
      if ((v * int64_t(M)) >> (16 + S) != v / N) return false;
    return true;
  }
  static_assert(exact(), "the multiplier divides exactly");
  template <class Ops> static void store(T* p, typename Ops::V v) {
    if constexpr (kVector<Ops>) {
      const __m128i q = _mm_add_epi16(v, _mm_set1_epi16(N / 2));
      const __m128i r = _mm_srli_epi16(_mm_mulhi_epu16(q, _mm_set1_epi16(short(M))), S);
      _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packus_epi16(r, r));
    } else {
      *p = T((v + N / 2) / N);
    }
  }
};
using Mean9 = Mean<9, 58255, 3>;
using Mean25 = Mean<25, 41944, 4>;

// ---- kernels -------------------------------------------------------------------

// out = RowA(column values of ColA) + RowB(column values of ColB).
template <class ColA, class RowA, class ColB = NoTaps, class RowB = NoTaps>
struct Kernel {
  using CA = ColA;
  using CB = ColB;
  using RA = RowA;
  using RB = RowB;
  static constexpr int kRadius = ColA::kRadius;
  static constexpr bool kTwo = ColB::kCount > 0;
};

using deriv::Box3;
using deriv::Box5;
using deriv::First3;
using deriv::First5;
using deriv::ScharrSmooth3;
using deriv::Second3;
using deriv::Second5;
using deriv::Smooth3;
using deriv::Smooth5;
using NegFirst3 = Taps<1, 0, -1>;
using NegFirst5 = Taps<1, 2, 0, -2, -1>;

// Each operation's 3x3 and 5x5 kernel and the shift of its 8s result.
struct SobelHoriz {
  using K3 = Kernel<First3, Smooth3>;
  using K5 = Kernel<First5, Smooth5>;
  static constexpr int kShift3 = 3, kShift5 = 7;
};
struct SobelVert {
  using K3 = Kernel<Smooth3, First3>;
  using K5 = Kernel<Smooth5, First5>;
  static constexpr int kShift3 = 3, kShift5 = 7;
};
struct SobelNegVert {
  using K3 = Kernel<Smooth3, NegFirst3>;
  using K5 = Kernel<Smooth5, NegFirst5>;
  static constexpr int kShift3 = 3, kShift5 = 7;
};
struct SobelHorizSecond {
  using K3 = Kernel<Second3, Smooth3>;
  using K5 = Kernel<Second5, Smooth5>;
  static constexpr int kShift3 = 4, kShift5 = 6;
};
struct SobelVertSecond {
  using K3 = Kernel<Smooth3, Second3>;
  using K5 = Kernel<Smooth5, Second5>;
  static constexpr int kShift3 = 4, kShift5 = 6;
};
struct SobelCross {
  using K3 = Kernel<First3, First3>;
  using K5 = Kernel<First5, First5>;
  static constexpr int kShift3 = 2, kShift5 = 6;
};
struct ScharrHoriz {
  using K3 = Kernel<First3, ScharrSmooth3>;
  using K5 = void;  // 3x3 only
  static constexpr int kShift3 = 5;
};
struct ScharrVert {
  using K3 = Kernel<ScharrSmooth3, First3>;
  using K5 = void;
  static constexpr int kShift3 = 5;
};
struct Laplacian {
  using K3 = Kernel<Smooth3, Second3, Second3, Smooth3>;
  using K5 = Kernel<Smooth5, Second5, Second5, Smooth5>;
  static constexpr int kShift3 = 4, kShift5 = 7;
};

// ---- the row loop ------------------------------------------------------------

template <class K, class Out>
struct Sink {
  typename Out::T* out;
  template <class Ops>
  void put(int x, const typename Ops::V* a, const typename Ops::V* b) const {
    typename Ops::V v = K::RA::template apply<Ops>(a);
    if constexpr (K::kTwo) v = Ops::add(v, K::RB::template apply<Ops>(b));
    else (void)b;
    Out::template store<Ops>(out + x, v);
  }
};

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
    deriv::verticalPass<typename K::CA, typename K::CB>(rows, y, a, b);
    deriv::horizontalPass<K::kRadius, K::kTwo>(a, b, roi.width, Sink<K, Out>{out});
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
    runKernel<Kernel<Box5, Box5>, Mean25>(src, srcStep, dst, dstStep, roi, border, borderValue, buffer);
  else
    runKernel<Kernel<Box3, Box3>, Mean9>(src, srcStep, dst, dstStep, roi, border, borderValue, buffer);
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

ZELCV_DERIVATIVE(SobelHoriz, 8u8s_C1R, SobelHoriz, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelVert, 8u8s_C1R, SobelVert, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelNegVert, 8u16s_C1R, SobelNegVert, k16s, Zel16s)
ZELCV_DERIVATIVE(SobelNegVert, 8u8s_C1R, SobelNegVert, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelHorizSecond, 8u16s_C1R, SobelHorizSecond, k16s, Zel16s)
ZELCV_DERIVATIVE(SobelHorizSecond, 8u8s_C1R, SobelHorizSecond, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelVertSecond, 8u16s_C1R, SobelVertSecond, k16s, Zel16s)
ZELCV_DERIVATIVE(SobelVertSecond, 8u8s_C1R, SobelVertSecond, k8s, Zel8s)
ZELCV_DERIVATIVE(SobelCross, 8u16s_C1R, SobelCross, k16s, Zel16s)
ZELCV_DERIVATIVE(SobelCross, 8u8s_C1R, SobelCross, k8s, Zel8s)
ZELCV_DERIVATIVE(ScharrHoriz, 8u16s_C1R, ScharrHoriz, k16s, Zel16s)
ZELCV_DERIVATIVE(ScharrHoriz, 8u8s_C1R, ScharrHoriz, k8s, Zel8s)
ZELCV_DERIVATIVE(ScharrVert, 8u16s_C1R, ScharrVert, k16s, Zel16s)
ZELCV_DERIVATIVE(ScharrVert, 8u8s_C1R, ScharrVert, k8s, Zel8s)
ZELCV_DERIVATIVE(Laplacian, 8u16s_C1R, Laplacian, k16s, Zel16s)
ZELCV_DERIVATIVE(Laplacian, 8u8s_C1R, Laplacian, k8s, Zel8s)

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
