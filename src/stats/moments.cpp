// Mean, mean with standard deviation, and extrema with their first
// locations, over the selected pixels of one channel.
#include <cmath>

#include "stats/extrema.h"
#include "stats/stat_args.h"

namespace zelcv {
namespace stats {
namespace {

template <bool kMask, bool kCoi, typename T>
ZelStatus mean(const T* src, int srcStep, const uint8_t* mask, int maskStep, ZeliSize roi, int coi, Zel64f* out) {
  const T* none = nullptr;
  if (ZelStatus st = checkStat(src, srcStep, none, 0, mask, maskStep, false, kMask, roi, coi, kCoi, {out}))
    return st;
  Acc<T> acc;
  reduceChosen<Kind::Sum, false, kMask>(sourceOf(src, srcStep, none, 0, mask, maskStep, roi, coi, kCoi), acc);
  *out = acc.count ? acc.plainSum() / double(acc.count) : 0.0;
  return zelStatusOk;
}

// Population deviation: sqrt(Q / n - mean^2), a negative variance counting
// as 0.
template <bool kMask, bool kCoi, typename T>
ZelStatus meanStdDev(const T* src, int srcStep, const uint8_t* mask, int maskStep, ZeliSize roi, int coi,
                     Zel64f* mean, Zel64f* stdDev) {
  const T* none = nullptr;
  if (ZelStatus st =
          checkStat(src, srcStep, none, 0, mask, maskStep, false, kMask, roi, coi, kCoi, {mean, stdDev}))
    return st;
  Acc<T> acc;
  reduceChosen<Kind::SumSq, false, kMask>(sourceOf(src, srcStep, none, 0, mask, maskStep, roi, coi, kCoi), acc);
  if (acc.count == 0) {
    *mean = 0.0;
    *stdDev = 0.0;
    return zelStatusOk;
  }
  const double n = double(acc.count);
  const double m = acc.plainSum() / n;
  const double var = acc.squares() / n - m * m;
  *mean = m;
  *stdDev = var > 0.0 ? std::sqrt(var) : 0.0;
  return zelStatusOk;
}

template <bool kMask, bool kCoi, typename T>
ZelStatus minMaxIndx(const T* src, int srcStep, const uint8_t* mask, int maskStep, ZeliSize roi, int coi,
                     Zel64f* minVal, Zel64f* maxVal, ZeliPoint* minIndex, ZeliPoint* maxIndex) {
  const T* none = nullptr;
  if (ZelStatus st = checkStat(src, srcStep, none, 0, mask, maskStep, false, kMask, roi, coi, kCoi,
                               {minVal, maxVal, minIndex, maxIndex}))
    return st;
  Extrema<T> e;
  extrema<kMask>(sourceOf(src, srcStep, none, 0, mask, maskStep, roi, coi, kCoi), e);
  *minVal = e.minX >= 0 ? double(e.min) : 0.0;
  *maxVal = e.maxX >= 0 ? double(e.max) : 0.0;
  *minIndex = {e.minX, e.minY};
  *maxIndex = {e.maxX, e.maxY};
  return zelStatusOk;
}

}  // namespace
}  // namespace stats
}  // namespace zelcv

using zelcv::stats::mean;
using zelcv::stats::meanStdDev;
using zelcv::stats::minMaxIndx;

#define ZELCV_MOMENT_MEMBERS(T, tn)                                                                             \
  ZELCV_ENTRY(zeliMean_##tn##_C1MR)(const T* src, int srcStep, const Zel8u* mask, int maskStep,               \
                                    ZeliSize roiSize, Zel64f* mean) {                                         \
    return ::mean<true, false>(src, srcStep, mask, maskStep, roiSize, 0, mean);                                \
  }                                                                                                            \
  ZELCV_ENTRY(zeliMean_##tn##_C3CMR)(const T* src, int srcStep, const Zel8u* mask, int maskStep,              \
                                     ZeliSize roiSize, int coi, Zel64f* mean) {                               \
    return ::mean<true, true>(src, srcStep, mask, maskStep, roiSize, coi, mean);                               \
  }                                                                                                            \
  ZELCV_ENTRY(zeliMean_StdDev_##tn##_C1MR)(const T* src, int srcStep, const Zel8u* mask, int maskStep,        \
                                           ZeliSize roiSize, Zel64f* mean, Zel64f* stdDev) {                  \
    return meanStdDev<true, false>(src, srcStep, mask, maskStep, roiSize, 0, mean, stdDev);                    \
  }                                                                                                            \
  ZELCV_ENTRY(zeliMean_StdDev_##tn##_C3CMR)(const T* src, int srcStep, const Zel8u* mask, int maskStep,       \
                                            ZeliSize roiSize, int coi, Zel64f* mean, Zel64f* stdDev) {        \
    return meanStdDev<true, true>(src, srcStep, mask, maskStep, roiSize, coi, mean, stdDev);                   \
  }                                                                                                            \
  ZELCV_ENTRY(zeliMinMaxIndx_##tn##_C1MR)(const T* src, int srcStep, const Zel8u* mask, int maskStep,         \
                                          ZeliSize roiSize, Zel64f* minVal, Zel64f* maxVal,                   \
                                          ZeliPoint* minIndex, ZeliPoint* maxIndex) {                         \
    return minMaxIndx<true, false>(src, srcStep, mask, maskStep, roiSize, 0, minVal, maxVal, minIndex,        \
                                   maxIndex);                                                                  \
  }                                                                                                            \
  ZELCV_ENTRY(zeliMinMaxIndx_##tn##_C3CMR)(const T* src, int srcStep, const Zel8u* mask, int maskStep,        \
                                           ZeliSize roiSize, int coi, Zel64f* minVal, Zel64f* maxVal,         \
                                           ZeliPoint* minIndex, ZeliPoint* maxIndex) {                        \
    return minMaxIndx<true, true>(src, srcStep, mask, maskStep, roiSize, coi, minVal, maxVal, minIndex,       \
                                  maxIndex);                                                                   \
  }

#define ZELCV_MOMENT_PLAIN_MEMBERS(T, tn)                                                                       \
  ZELCV_ENTRY(zeliMean_##tn##_C1R)(const T* src, int srcStep, ZeliSize roiSize, Zel64f* mean) {               \
    return ::mean<false, false>(src, srcStep, nullptr, 0, roiSize, 0, mean);                                   \
  }                                                                                                            \
  ZELCV_ENTRY(zeliMean_StdDev_##tn##_C1R)(const T* src, int srcStep, ZeliSize roiSize, Zel64f* mean,          \
                                          Zel64f* stdDev) {                                                    \
    return meanStdDev<false, false>(src, srcStep, nullptr, 0, roiSize, 0, mean, stdDev);                       \
  }                                                                                                            \
  ZELCV_ENTRY(zeliMinMaxIndx_##tn##_C1R)(const T* src, int srcStep, ZeliSize roiSize, Zel64f* minVal,         \
                                         Zel64f* maxVal, ZeliPoint* minIndex, ZeliPoint* maxIndex) {           \
    return minMaxIndx<false, false>(src, srcStep, nullptr, 0, roiSize, 0, minVal, maxVal, minIndex, maxIndex); \
  }

ZELCV_MOMENT_MEMBERS(Zel8u, 8u)
ZELCV_MOMENT_MEMBERS(Zel8s, 8s)
ZELCV_MOMENT_MEMBERS(Zel16u, 16u)
ZELCV_MOMENT_MEMBERS(Zel32f, 32f)
ZELCV_MOMENT_PLAIN_MEMBERS(Zel8u, 8u)
ZELCV_MOMENT_PLAIN_MEMBERS(Zel16u, 16u)
ZELCV_MOMENT_PLAIN_MEMBERS(Zel32f, 32f)
