// Applying a Haar classifier stage: the exported entries, their checks, and
// the SSE2 kernels.
#include <limits.h>

#include <type_traits>

#include "detect/haar_kernels.h"
#include "kernels/dispatch.h"

namespace zelcv {
namespace haar {

int64_t applySse2(const ApplyArgs& a, const float*) { return applyRows<Sse2Ops, float>(a); }
int64_t applySse2(const ApplyArgs& a, const int32_t*) { return applyRows<Sse2Ops, int32_t>(a); }

namespace {

// A step below its row (in bytes) or not positive.
bool stepShort(int step, int64_t rowBytes) { return step <= 0 || step < rowBytes; }

template <typename Elem>
ZelStatus apply(const Elem* src, int srcStep, const Elem* tilt, int tiltStep, bool mixed, const Zel32f* norm,
                int normStep, Zel8u* mask, int maskStep, ZeliSize roi, int* positiveCount, Zel32f threshold,
                const void* classifier, WeightType type) {
  if (!src || (mixed && !tilt) || !norm || !mask || !positiveCount || !classifier) return zelStatusNullPointer;
  if (ZelStatus s = checkSize(roi)) return s;
  const Classifier& c = *static_cast<const Classifier*>(classifier);
  const int64_t integralRow = (int64_t(roi.width) + c.width) * 4;
  if (stepShort(srcStep, integralRow) || (mixed && stepShort(tiltStep, integralRow)) ||
      stepShort(normStep, int64_t(roi.width) * 4) || stepShort(maskStep, roi.width))
    return zelStatusBadStep;
  if ((srcStep | (mixed ? tiltStep : 0) | normStep) & 3) return zelStatusMisalignedStep;
  if (c.magic != kMagic || c.weightType != type || (!mixed && c.tiltedCount > 0)) return zelStatusBadContext;

  ApplyArgs a;
  a.src = src;
  a.srcStride = srcStep / 4;
  a.tilt = mixed ? tilt : src;
  a.tiltStride = mixed ? tiltStep / 4 : srcStep / 4;
  a.norm = norm;
  a.normStep = normStep;
  a.mask = mask;
  a.maskStep = maskStep;
  a.width = roi.width;
  a.height = roi.height;
  a.threshold = threshold;
  a.classifier = &c;
  const Elem* tag = nullptr;
  const int64_t count = withChosenIsa<IsaLevel::Avx2>([&](auto isa) -> int64_t {
    if constexpr (std::is_same<typename decltype(isa)::Isa, simd::Sse2>::value)
      return applySse2(a, tag);
    else
      return avx2::apply(a, tag);
  });
  *positiveCount = count > INT_MAX ? INT_MAX : int(count);
  return zelStatusOk;
}

}  // namespace
}  // namespace haar
}  // namespace zelcv

using zelcv::haar::apply;
using zelcv::haar::WeightType;

ZELCV_ENTRY(zeliApplyHaarClassifier_32f_C1R)(const Zel32f* src, int srcStep, const Zel32f* norm, int normStep,
                                             Zel8u* mask, int maskStep, ZeliSize roiSize, int* positiveCount,
                                             Zel32f threshold, const ZeliHaarClassifier_32f* classifier) {
  return apply(src, srcStep, src, srcStep, false, norm, normStep, mask, maskStep, roiSize, positiveCount,
               threshold, classifier, WeightType::F32);
}

ZELCV_ENTRY(zeliApplyHaarClassifier_32s32f_C1R)(const Zel32s* src, int srcStep, const Zel32f* norm,
                                                int normStep, Zel8u* mask, int maskStep, ZeliSize roiSize,
                                                int* positiveCount, Zel32f threshold,
                                                const ZeliHaarClassifier_32s* classifier) {
  return apply(src, srcStep, src, srcStep, false, norm, normStep, mask, maskStep, roiSize, positiveCount,
               threshold, classifier, WeightType::S32);
}

ZELCV_ENTRY(zeliApplyMixedHaarClassifier_32f_C1R)(const Zel32f* src, int srcStep, const Zel32f* tilt,
                                                  int tiltStep, const Zel32f* norm, int normStep, Zel8u* mask,
                                                  int maskStep, ZeliSize roiSize, int* positiveCount,
                                                  Zel32f threshold, const ZeliHaarClassifier_32f* classifier) {
  return apply(src, srcStep, tilt, tiltStep, true, norm, normStep, mask, maskStep, roiSize, positiveCount,
               threshold, classifier, WeightType::F32);
}

ZELCV_ENTRY(zeliApplyMixedHaarClassifier_32s32f_C1R)(const Zel32s* src, int srcStep, const Zel32s* tilt,
                                                     int tiltStep, const Zel32f* norm, int normStep,
                                                     Zel8u* mask, int maskStep, ZeliSize roiSize,
                                                     int* positiveCount, Zel32f threshold,
                                                     const ZeliHaarClassifier_32s* classifier) {
  return apply(src, srcStep, tilt, tiltStep, true, norm, normStep, mask, maskStep, roiSize, positiveCount,
               threshold, classifier, WeightType::S32);
}
