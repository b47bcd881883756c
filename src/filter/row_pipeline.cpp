// The row pass of the separable pipeline: each source row is filtered
// horizontally into the caller's row storage. Only the two extended ends of
// a row are built in the work buffer; the middle is read in place.
#include <stddef.h>
#include <string.h>

#include <type_traits>

#include "core/alloc.h"
#include "core/status.h"
#include "filter/border.h"
#include "filter/sepfilter_kernels.h"

namespace zelcv {
namespace {

using sep::DoubleSum;
using sep::FloatSum;
using sep::LowScale;

// Checks shared by every row member, in their fixed order; the divisor test
// that follows differs per member.
template <typename S, int kChannels>
ZelStatus checkRow(const S* src, int srcStep, void* const* dst, ZeliSize roi, const void* kernel,
                   int kernelSize, int xAnchor, ZeliBorderType border, const void* borderValue,
                   const Zel8u* buffer) {
  if (ZelStatus s = checkPointers({src, dst, kernel, buffer})) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  for (int y = 0; y < roi.height; ++y)
    if (!dst[y]) return zelStatusNullPointer;
  // Three-channel members refuse a null value array whatever the border kind.
  if (kChannels == 3 && !borderValue) return zelStatusNullPointer;
  if (kernelSize < 1) return zelStatusBadSize;
  if (xAnchor < 0 || xAnchor >= kernelSize) return zelStatusBadAnchor;
  if (ZelStatus s = checkSteps({image(src, srcStep, kChannels)}, roi.width)) return s;
  // Exactly the three kinds the pipeline serves; flags are refused, and this
  // family answers with zelStatusBadArgument rather than zelStatusBadBorder.
  if (border != zelBorderConstant && border != zelBorderReplicate && border != zelBorderInMemory)
    return zelStatusBadArgument;
  return zelStatusOk;
}

// Filters every row with `policy`; `ext` has room for one extended end of
// 2 kernelSize - 2 pixels.
template <class P, int kChannels, class Taps>
void runRows(const P& policy, const Taps& taps, typename P::Source* ext, const typename P::Source* src,
             int srcStep, typename P::Out* const* dst, ZeliSize roi, int kernelSize, int xAnchor,
             ZeliBorderType border, const typename P::Source* borderValue) {
  using S = typename P::Source;
  constexpr int ch = kChannels;
  const int width = roi.width;
  const int right = kernelSize - 1 - xAnchor;
  const size_t endBytes = size_t(kernelSize - 1) * ch * sizeof(S);
  auto span = [&](const S* from, typename P::Out* out, int pixels) {
    sep::filterSpanAnySize(policy, sep::RowSource<S>{from, ch}, out, pixels * ch, taps, kernelSize);
  };
  for (int y = 0; y < roi.height; ++y) {
    const S* row = reinterpret_cast<const S*>(reinterpret_cast<const uint8_t*>(src) + ptrdiff_t(y) * srcStep);
    typename P::Out* out = dst[y];
    if (border == zelBorderInMemory) {  // both ends exist in memory
      span(row - xAnchor * ch, out, width);
    } else if (width >= kernelSize - 1) {
      // Left end: xAnchor border pixels, then pixels 0 .. kernelSize-2.
      extendRowBorder<S>(row, width, ch, border, borderValue, xAnchor, 0, ext, nullptr);
      memcpy(ext + xAnchor * ch, row, endBytes);
      span(ext, out, xAnchor);
      span(row, out + xAnchor * ch, width - kernelSize + 1);
      // Right end: the last kernelSize-1 pixels, then `right` border pixels.
      memcpy(ext, row + (width - kernelSize + 1) * ch, endBytes);
      extendRowBorder<S>(row, width, ch, border, borderValue, 0, right, nullptr, ext + (kernelSize - 1) * ch);
      span(ext, out + (width - kernelSize + 1 + xAnchor) * ch, right);
    } else {  // a row shorter than the kernel: wholly from the buffer
      extendRowBorder<S>(row, width, ch, border, borderValue, xAnchor, right, ext, ext + (xAnchor + width) * ch);
      memcpy(ext + xAnchor * ch, row, size_t(width) * ch * sizeof(S));
      span(ext, out, width);
    }
  }
}

// Work buffer: the prepared taps (one 16-byte vector per tap), then one
// extended row end. The start is aligned up to 32 bytes.
struct RowBuffer {
  __m128i* taps;
  uint8_t* ext;
  RowBuffer(Zel8u* buffer, int kernelSize) {
    uint8_t* base = alignUp(buffer, 32);
    taps = reinterpret_cast<__m128i*>(base);
    ext = base + sizeof(__m128i) * size_t(kernelSize);
  }
};

// Runs `policy` with its taps broadcast into the buffer.
template <class P, int kChannels, typename Tap>
void runPrepared(const P& policy, const RowBuffer& buf, const Tap* kernel, float scale,
                 const typename P::Source* src, int srcStep, typename P::Out* const* dst, ZeliSize roi,
                 int kernelSize, int xAnchor, ZeliBorderType border, const typename P::Source* borderValue) {
  auto* vecTaps = reinterpret_cast<typename P::Prepared*>(buf.taps);
  for (int k = 0; k < kernelSize; ++k) vecTaps[k] = P::Tap::broadcast(P::Tap::make(kernel[k], scale));
  runRows<P, kChannels>(policy, sep::PreparedTaps<typename P::TapType>{vecTaps}, reinterpret_cast<typename P::Source*>(buf.ext), src,
                        srcStep, dst, roi, kernelSize, xAnchor, border, borderValue);
}

// Integer members: the exact integer forms where they give the same bits,
// otherwise single-precision (or fixed-point) sums.
template <class P, int kChannels>
void runIntegerRows(const P& policy, const Zel16s* kernel, int divisor, const typename P::Source* src, int srcStep,
                    typename P::Out* const* dst, ZeliSize roi, int kernelSize, int xAnchor, ZeliBorderType border,
                    const typename P::Source* borderValue, Zel8u* buffer) {
  using S = typename P::Source;
  using D = typename P::Out;
  const RowBuffer buf(buffer, kernelSize);
  const float scale = 1.0f / static_cast<float>(divisor);
  if constexpr (std::is_same<P, FloatSum<S, D, false>>::value && !std::is_same<S, Zel16u>::value) {
    int64_t tapSum = 0;
    const int64_t maxAbs = std::is_same<S, Zel8u>::value ? 255 : 32768;
    if (sep::exactInFloat(kernel, kernelSize, divisor, maxAbs, &tapSum)) {
      if constexpr (std::is_same<S, Zel8u>::value) {
        // Non-negative taps with a power-of-two divisor: a shift, the cheapest form.
        int shift = 0;
        if (sep::ShiftSum<>::fits(kernel, kernelSize, divisor, &shift)) {
          runPrepared<sep::ShiftSum<>, kChannels>(sep::ShiftSum<>{shift}, buf, kernel, scale, src, srcStep, dst, roi,
                                                  kernelSize, xAnchor, border, borderValue);
          return;
        }
        if (tapSum * 255 <= 32767) {
          runPrepared<sep::ShortSum<>, kChannels>(sep::ShortSum<>{scale, divisor == 1}, buf, kernel, scale, src, srcStep,
                                                dst, roi, kernelSize, xAnchor, border, borderValue);
          return;
        }
      }
      using Pairs = sep::PairSum<S, D, false>;
      Pairs::preparePairs(kernel, kernelSize, buf.taps);
      runRows<Pairs, kChannels>(Pairs{buf.taps, scale}, sep::ComputedTaps<Zel16s>{kernel, scale},
                                reinterpret_cast<S*>(buf.ext), src, srcStep, dst, roi, kernelSize, xAnchor, border,
                                borderValue);
      return;
    }
  }
  runPrepared<P, kChannels>(policy, buf, kernel, scale, src, srcStep, dst, roi, kernelSize, xAnchor, border,
                            borderValue);
}

enum class DivisorRule { nonZero, positive, unchecked };

inline bool divisorRefused(DivisorRule rule, int divisor) {
  return (rule == DivisorRule::nonZero && divisor == 0) || (rule == DivisorRule::positive && divisor < 1);
}

// Members with a divisor: checks, then single-precision or fixed-point sums.
template <class P, int kChannels, typename Tap>
ZelStatus rowMember(const P& policy, DivisorRule rule, const typename P::Source* src, int srcStep,
                    typename P::Out** dst, ZeliSize roi, const Tap* kernel, int kernelSize, int xAnchor,
                    ZeliBorderType border, const typename P::Source* borderValue, int divisor, Zel8u* buffer) {
  if (ZelStatus s = checkRow<typename P::Source, kChannels>(src, srcStep, reinterpret_cast<void* const*>(dst),
                                                            roi, kernel, kernelSize, xAnchor, border,
                                                            borderValue, buffer))
    return s;
  if (divisorRefused(rule, divisor)) return zelStatusBadArgument;
  runIntegerRows<P, kChannels>(policy, kernel, divisor, src, srcStep, dst, roi, kernelSize, xAnchor, border,
                               borderValue, buffer);
  return zelStatusOk;
}

template <int kChannels>
ZelStatus rowMember32f(const Zel32f* src, int srcStep, Zel32f** dst, ZeliSize roi, const Zel32f* kernel,
                       int kernelSize, int xAnchor, ZeliBorderType border, const Zel32f* borderValue,
                       Zel8u* buffer) {
  if (ZelStatus s = checkRow<Zel32f, kChannels>(src, srcStep, reinterpret_cast<void* const*>(dst), roi, kernel,
                                                kernelSize, xAnchor, border, borderValue, buffer))
    return s;
  runPrepared<DoubleSum, kChannels>(DoubleSum{}, RowBuffer(buffer, kernelSize), kernel, 1.0f, src, srcStep, dst,
                                    roi, kernelSize, xAnchor, border, borderValue);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using zelcv::DivisorRule;
using zelcv::rowMember;

// One-channel members take the border value by value, three-channel ones
// by array (`valueArg` makes both a pointer).
#define ZELCV_ROW_MEMBER(suffix, S, D, Value, valueArg, Policy, channels, policyValue, rule)                    \
  ZELCV_ENTRY(zeliFilterRowBorderPipeline_##suffix)(const S* src, int srcStep, D** dst, ZeliSize roiSize,       \
                                                    const Zel16s* kernel, int kernelSize, int xAnchor,         \
                                                    ZeliBorderType borderType, Value borderValue, int divisor, \
                                                    Zel8u* buffer) {                                           \
    return rowMember<Policy, channels>(policyValue, DivisorRule::rule, src, srcStep, dst, roiSize, kernel,     \
                                       kernelSize, xAnchor, borderType, valueArg, divisor, buffer);            \
  }

ZELCV_ROW_MEMBER(16s_C1R, Zel16s, Zel16s, Zel16s, &borderValue, zelcv::sep::Row16s, 1, {}, nonZero)
ZELCV_ROW_MEMBER(16s_C3R, Zel16s, Zel16s, const Zel16s*, borderValue, zelcv::sep::Row16s, 3, {}, nonZero)
// A negative divisor is refused for unsigned data only.
ZELCV_ROW_MEMBER(16u_C1R, Zel16u, Zel16u, Zel16u, &borderValue, zelcv::sep::Row16u, 1, {}, positive)
ZELCV_ROW_MEMBER(16u_C3R, Zel16u, Zel16u, const Zel16u*, borderValue, zelcv::sep::Row16u, 3, {}, positive)
// The one-channel 8u member never checked its divisor; a zero divisor makes
// the scaled taps infinite or NaN and the results follow the clamp's rules.
ZELCV_ROW_MEMBER(8u16s_C1R, Zel8u, Zel16s, Zel8u, &borderValue, zelcv::sep::Row8u16s, 1, {}, unchecked)
ZELCV_ROW_MEMBER(8u16s_C3R, Zel8u, Zel16s, const Zel8u*, borderValue, zelcv::sep::Row8u16s, 3, {}, nonZero)
ZELCV_ROW_MEMBER(Low_16s_C1R, Zel16s, Zel16s, Zel16s, &borderValue, zelcv::sep::LowSum<>, 1,
                 {zelcv::LowScale::of(divisor)}, nonZero)
ZELCV_ROW_MEMBER(Low_16s_C3R, Zel16s, Zel16s, const Zel16s*, borderValue, zelcv::sep::LowSum<>, 3,
                 {zelcv::LowScale::of(divisor)}, nonZero)

ZELCV_ENTRY(zeliFilterRowBorderPipeline_32f_C1R)(const Zel32f* src, int srcStep, Zel32f** dst, ZeliSize roiSize,
                                                 const Zel32f* kernel, int kernelSize, int xAnchor,
                                                 ZeliBorderType borderType, Zel32f borderValue, Zel8u* buffer) {
  return zelcv::rowMember32f<1>(src, srcStep, dst, roiSize, kernel, kernelSize, xAnchor, borderType, &borderValue,
                                buffer);
}
ZELCV_ENTRY(zeliFilterRowBorderPipeline_32f_C3R)(const Zel32f* src, int srcStep, Zel32f** dst, ZeliSize roiSize,
                                                 const Zel32f* kernel, int kernelSize, int xAnchor,
                                                 ZeliBorderType borderType, const Zel32f* borderValue,
                                                 Zel8u* buffer) {
  return zelcv::rowMember32f<3>(src, srcStep, dst, roiSize, kernel, kernelSize, xAnchor, borderType, borderValue,
                                buffer);
}
