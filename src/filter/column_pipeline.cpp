// The column pass of the separable pipeline: kernelSize consecutive row
// pointers make one output row. The caller expresses vertical borders by the
// pointers it passes, so nothing here looks beyond the rows it is given.
// The sums of a block stay in registers, so these loops leave the work
// buffer untouched; it is still required (and checked) by the interface.
#include <stddef.h>
#include <stdint.h>

#include <type_traits>

#include "core/status.h"
#include "filter/sepfilter_kernels.h"

namespace zelcv {
namespace {

using sep::FloatSum;
using sep::SingleSum;

enum class Divisor { checked, none };

template <int kChannels, class P, class Taps>
void runColumns(const P& policy, const Taps& taps, const typename P::Source* const* src, typename P::Out* dst,
                int dstStep, ZeliSize roi, int kernelSize) {
  const int n = roi.width * kChannels;
  for (int y = 0; y < roi.height; ++y) {
    auto* out = reinterpret_cast<typename P::Out*>(reinterpret_cast<uint8_t*>(dst) + ptrdiff_t(y) * dstStep);
    sep::filterSpanAnySize(policy, sep::ColumnSource<typename P::Source>{src + y}, out, n, taps, kernelSize);
  }
}

template <class P, int kChannels, typename Tap>
ZelStatus columnMember(const P& policy, Divisor rule, const typename P::Source* const* src, typename P::Out* dst,
                       int dstStep, ZeliSize roi, const Tap* kernel, int kernelSize, int divisor, Zel8u* buffer) {
  if (ZelStatus s = checkPointers({src, dst, kernel})) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  // Every row pointer is tested before the kernel size itself is validated.
  const int64_t rows = int64_t(kernelSize) + roi.height - 1;
  for (int64_t i = 0; i < rows; ++i)
    if (!src[i]) return zelStatusNullPointer;
  if (kernelSize < 1) return zelStatusBadSize;
  if (ZelStatus s = checkSteps({image(dst, dstStep, kChannels)}, roi.width)) return s;
  if (!buffer) return zelStatusNullPointer;
  if (rule == Divisor::checked && divisor == 0) return zelStatusBadArgument;

  const float scale = rule == Divisor::checked ? 1.0f / static_cast<float>(divisor) : 1.0f;
  using D = typename P::Out;
  if constexpr (std::is_same<P, FloatSum<Zel16s, D, true>>::value) {
    // The exact integer form gives the same bits with pmaddwd; its tap pairs
    // live on the stack, so it serves kernels of up to 2 kMaxPairs taps.
    constexpr int kMaxPairs = 32;
    int64_t tapSum = 0;
    if (kernelSize <= 2 * kMaxPairs && sep::exactInFloat(kernel, kernelSize, divisor, 32768, &tapSum)) {
      using Pairs = sep::PairSum<Zel16s, D, true>;
      __m128i pairs[kMaxPairs];
      Pairs::preparePairs(kernel, kernelSize, pairs);
      runColumns<kChannels>(Pairs{pairs, scale}, sep::ComputedTaps<Zel16s>{kernel, scale}, src, dst, dstStep,
                            roi, kernelSize);
      return zelStatusOk;
    }
  }
  // The taps are formed where they are used (the work buffer is sized by
  // the width, not the kernel); the sizes 3 and 5 keep them in registers.
  runColumns<kChannels>(policy, sep::ComputedTaps<Tap>{kernel, scale}, src, dst, dstStep, roi, kernelSize);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using zelcv::columnMember;
using zelcv::Divisor;

#define ZELCV_COLUMN_MEMBER(suffix, S, D, Policy, channels, policyValue)                                      \
  ZELCV_ENTRY(zeliFilterColumnPipeline_##suffix)(const S** src, D* dst, int dstStep, ZeliSize roiSize,         \
                                                 const Zel16s* kernel, int kernelSize, int divisor,           \
                                                 Zel8u* buffer) {                                             \
    return columnMember<Policy, channels>(policyValue, Divisor::checked, src, dst, dstStep, roiSize, kernel,  \
                                          kernelSize, divisor, buffer);                                       \
  }

// Integer members round to nearest (ties to even) at every pixel.
ZELCV_COLUMN_MEMBER(16s_C1R, Zel16s, Zel16s, zelcv::sep::Col16s, 1, {})
ZELCV_COLUMN_MEMBER(16s_C3R, Zel16s, Zel16s, zelcv::sep::Col16s, 3, {})
ZELCV_COLUMN_MEMBER(16s8s_C1R, Zel16s, Zel8s, zelcv::sep::Col16s8s, 1, {})
ZELCV_COLUMN_MEMBER(16s8s_C3R, Zel16s, Zel8s, zelcv::sep::Col16s8s, 3, {})
ZELCV_COLUMN_MEMBER(16s8u_C1R, Zel16s, Zel8u, zelcv::sep::Col16s8u, 1, {})
ZELCV_COLUMN_MEMBER(16s8u_C3R, Zel16s, Zel8u, zelcv::sep::Col16s8u, 3, {})
ZELCV_COLUMN_MEMBER(16u_C1R, Zel16u, Zel16u, zelcv::sep::Col16u, 1, {})
ZELCV_COLUMN_MEMBER(16u_C3R, Zel16u, Zel16u, zelcv::sep::Col16u, 3, {})
ZELCV_COLUMN_MEMBER(Low_16s_C1R, Zel16s, Zel16s, zelcv::sep::LowSum<>, 1, {zelcv::sep::LowScale::of(divisor)})
ZELCV_COLUMN_MEMBER(Low_16s_C3R, Zel16s, Zel16s, zelcv::sep::LowSum<>, 3, {zelcv::sep::LowScale::of(divisor)})

ZELCV_ENTRY(zeliFilterColumnPipeline_32f_C1R)(const Zel32f** src, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                              const Zel32f* kernel, int kernelSize, Zel8u* buffer) {
  return columnMember<zelcv::sep::SingleSum, 1>({}, Divisor::none, src, dst, dstStep, roiSize, kernel, kernelSize,
                                                1, buffer);
}
ZELCV_ENTRY(zeliFilterColumnPipeline_32f_C3R)(const Zel32f** src, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                              const Zel32f* kernel, int kernelSize, Zel8u* buffer) {
  return columnMember<zelcv::sep::SingleSum, 3>({}, Divisor::none, src, dst, dstStep, roiSize, kernel, kernelSize,
                                                1, buffer);
}
