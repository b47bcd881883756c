// Step checks of the integral family. Its outputs are wider than the ROI
// (w + 1 or w + 2 columns) and the rectangle statistics read integrals wider
// still, so each step is compared with its own byte count rather than with
// the ROI's row bytes.
#ifndef ZELCV_DETECT_INTEGRAL_CHECKS_H
#define ZELCV_DETECT_INTEGRAL_CHECKS_H

#include <stdint.h>

#include <initializer_list>
#include <type_traits>

#include "core/status.h"

namespace zelcv {

struct StepNeed {
  int step;
  int64_t bytes;  // the smallest acceptable step
  int alignMask;  // element bytes - 1; 0 for 8u images
};

template <typename T>
constexpr StepNeed stepNeed(int step, int64_t elements) {
  return {step, elements * int64_t(sizeof(T)), int(sizeof(T)) - 1};
}

// All steps against their byte counts (-14), then all alignments (-108).
inline ZelStatus checkStepNeeds(std::initializer_list<StepNeed> needs) {
  for (const StepNeed& n : needs)
    if (n.step <= 0 || n.step < n.bytes) return zelStatusBadStep;
  int misaligned = 0;
  for (const StepNeed& n : needs) misaligned |= n.step & n.alignMask;
  return misaligned ? zelStatusMisalignedStep : zelStatusOk;
}

// Pointers (-8), ROI (-6), then the steps.
inline ZelStatus checkIntegralArgs(std::initializer_list<const void*> pointers, ZeliSize roi,
                                   std::initializer_list<StepNeed> needs) {
  if (ZelStatus s = checkPointers(pointers)) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  return checkStepNeeds(needs);
}

// An 8u source of w columns and outputs of w + extraCols columns.
template <typename SumT>
inline ZelStatus check8uIntegral(const Zel8u* src, int srcStep, const SumT* dst, int dstStep,
                                 ZeliSize roi, int extraCols) {
  return checkIntegralArgs({src, dst}, roi,
                           {stepNeed<Zel8u>(srcStep, roi.width),
                            stepNeed<SumT>(dstStep, int64_t(roi.width) + extraCols)});
}
template <typename SumT, typename SqT>
inline ZelStatus check8uIntegral(const Zel8u* src, int srcStep, const SumT* dst, int dstStep,
                                 const SqT* sqr, int sqrStep, ZeliSize roi, int extraCols) {
  const int64_t cols = int64_t(roi.width) + extraCols;
  return checkIntegralArgs({src, dst, sqr}, roi,
                           {stepNeed<Zel8u>(srcStep, roi.width), stepNeed<SumT>(dstStep, cols),
                            stepNeed<SqT>(sqrStep, cols)});
}

template <typename T>
inline T* rowAt(T* base, int step, int64_t row) {
  using Byte = typename std::conditional<std::is_const<T>::value, const uint8_t, uint8_t>::type;
  return reinterpret_cast<T*>(reinterpret_cast<Byte*>(base) + row * step);
}

// 32s outputs are built in unsigned arithmetic, which wraps without UB.
inline uint32_t* asUnsigned(Zel32s* p) { return reinterpret_cast<uint32_t*>(p); }
inline const uint32_t* asUnsigned(const Zel32s* p) { return reinterpret_cast<const uint32_t*>(p); }

}  // namespace zelcv

#endif  // ZELCV_DETECT_INTEGRAL_CHECKS_H
