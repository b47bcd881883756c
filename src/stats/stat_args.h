// The arguments every statistic shares: one or two images, an optional mask,
// an optional channel of interest, and result pointers. Checked in the
// library's order: every pointer (images, mask, results), the ROI size, the
// steps of the images and the mask, the alignment of the image steps, and
// last the channel of interest.
#ifndef ZELCV_STATS_STAT_ARGS_H
#define ZELCV_STATS_STAT_ARGS_H

#include <initializer_list>

#include "core/status.h"
#include "kernels/dispatch.h"
#include "stats/reduce.h"

namespace zelcv {
namespace stats {

// coi: 0 for one-channel images, else the 1-based channel of interest of a
// three-channel image.
template <typename T>
ZelStatus checkStat(const T* a, int aStep, const T* b, int bStep, const uint8_t* mask, int maskStep, bool two,
                    bool masked, ZeliSize roi, int coi, bool hasCoi, std::initializer_list<const void*> results) {
  const int channels = hasCoi ? 3 : 1;
  if (!a || (two && !b) || (masked && !mask)) return zelStatusNullPointer;
  if (ZelStatus s = checkPointers(results)) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  const ImageArg images[3] = {image(a, aStep, channels), image(b, bStep, channels), maskImage(mask, maskStep)};
  const bool used[3] = {true, two, masked};
  for (int i = 0; i < 3; ++i)
    if (used[i] && (images[i].step <= 0 || images[i].step < images[i].rowBytes(roi.width))) return zelStatusBadStep;
  int misaligned = 0;
  for (int i = 0; i < 3; ++i)
    if (used[i]) misaligned |= images[i].step & images[i].alignMask;
  if (misaligned) return zelStatusMisalignedStep;
  if (hasCoi && (coi < 1 || coi > 3)) return zelStatusBadChannelOfInterest;
  return zelStatusOk;
}

// The reduction's view of checked arguments.
template <typename T>
Source<T> sourceOf(const T* a, int aStep, const T* b, int bStep, const uint8_t* mask, int maskStep, ZeliSize roi,
                   int coi, bool hasCoi) {
  const int offset = hasCoi ? coi - 1 : 0;
  return {a + offset, aStep, b ? b + offset : nullptr, bStep, mask, maskStep, hasCoi ? 3 : 1, roi.width, roi.height};
}

// A reduction on the widest rows the processor allows; every choice gives
// the same bits.
template <Kind K, bool kTwo, bool kMask, typename T>
void reduceChosen(const Source<T>& s, Acc<T>& acc) {
  withChosenIsa<IsaLevel::Avx2>([&](auto isa) { reduce<K, kTwo, kMask, typename decltype(isa)::Isa>(s, acc); });
}

}  // namespace stats
}  // namespace zelcv

#endif  // ZELCV_STATS_STAT_ARGS_H
