// Norms of an image, of the difference of two images, and relative norms:
// infinity (largest absolute value), L1 (sum of absolute values) and L2
// (square root of the sum of squares), plain, masked, and over one channel
// of interest of a three-channel image.
#include <cmath>
#include <cstring>

#include "stats/stat_args.h"

namespace zelcv {
namespace stats {
namespace {

template <Kind K, bool kTwo, bool kMask, typename T>
double normOf(const Source<T>& s) {
  Acc<T> acc;
  reduceChosen<K, kTwo, kMask>(s, acc);
  const double t = acc.total(K);
  return K == Kind::L2 ? std::sqrt(t) : t;
}

template <Kind K, bool kTwo, bool kMask, bool kCoi, typename T>
ZelStatus norm(const T* a, int aStep, const T* b, int bStep, const uint8_t* mask, int maskStep, ZeliSize roi,
               int coi, Zel64f* value) {
  if (ZelStatus st = checkStat(a, aStep, b, bStep, mask, maskStep, kTwo, kMask, roi, coi, kCoi, {value}))
    return st;
  *value = normOf<K, kTwo, kMask>(sourceOf(a, aStep, b, bStep, mask, maskStep, roi, coi, kCoi));
  return zelStatusOk;
}

// ||a - b|| / ||b||. A zero divisor gives +inf (or -inf for a negative
// dividend, which a norm never is) and the warning, or the quiet NaN with
// all high bits set when the dividend is zero too.
template <Kind K, bool kMask, typename T>
ZelStatus relative(const T* a, int aStep, const T* b, int bStep, const uint8_t* mask, int maskStep, ZeliSize roi,
                   Zel64f* value) {
  if (ZelStatus st = checkStat(a, aStep, b, bStep, mask, maskStep, true, kMask, roi, 0, false, {value})) return st;
  const double num = normOf<K, true, kMask>(sourceOf(a, aStep, b, bStep, mask, maskStep, roi, 0, false));
  const double den = normOf<K, false, kMask>(sourceOf(b, bStep, static_cast<const T*>(nullptr), 0, mask, maskStep,
                                                      roi, 0, false));
  if (den != 0.0) {
    *value = num / den;
    return zelStatusOk;
  }
  if (num > 0) {
    *value = HUGE_VAL;
  } else if (num < 0) {
    *value = -HUGE_VAL;
  } else {
    const uint64_t bits = 0xFFF8000000000000ull;
    std::memcpy(value, &bits, sizeof bits);
  }
  return zelStatusDivByZero;
}

}  // namespace
}  // namespace stats
}  // namespace zelcv

using zelcv::stats::Kind;
using zelcv::stats::norm;
using zelcv::stats::relative;

#define ZELCV_NORM_MEMBERS(Name, K, T, tn)                                                                     \
  ZELCV_ENTRY(zeliNorm_##Name##_##tn##_C1MR)(const T* src, int srcStep, const Zel8u* mask, int maskStep,    \
                                             ZeliSize roiSize, Zel64f* value) {                             \
    return norm<Kind::K, false, true, false>(src, srcStep, static_cast<const T*>(nullptr), 0, mask, maskStep, \
                                             roiSize, 0, value);                                             \
  }                                                                                                          \
  ZELCV_ENTRY(zeliNorm_##Name##_##tn##_C3CMR)(const T* src, int srcStep, const Zel8u* mask, int maskStep,   \
                                              ZeliSize roiSize, int coi, Zel64f* value) {                   \
    return norm<Kind::K, false, true, true>(src, srcStep, static_cast<const T*>(nullptr), 0, mask, maskStep,  \
                                            roiSize, coi, value);                                            \
  }                                                                                                          \
  ZELCV_ENTRY(zeliNormDiff_##Name##_##tn##_C1MR)(const T* src1, int src1Step, const T* src2, int src2Step,  \
                                                 const Zel8u* mask, int maskStep, ZeliSize roiSize,         \
                                                 Zel64f* value) {                                            \
    return norm<Kind::K, true, true, false>(src1, src1Step, src2, src2Step, mask, maskStep, roiSize, 0,     \
                                            value);                                                          \
  }                                                                                                          \
  ZELCV_ENTRY(zeliNormDiff_##Name##_##tn##_C3CMR)(const T* src1, int src1Step, const T* src2, int src2Step, \
                                                  const Zel8u* mask, int maskStep, ZeliSize roiSize,        \
                                                  int coi, Zel64f* value) {                                  \
    return norm<Kind::K, true, true, true>(src1, src1Step, src2, src2Step, mask, maskStep, roiSize, coi,    \
                                           value);                                                           \
  }                                                                                                          \
  ZELCV_ENTRY(zeliNormRel_##Name##_##tn##_C1MR)(const T* src1, int src1Step, const T* src2, int src2Step,   \
                                                const Zel8u* mask, int maskStep, ZeliSize roiSize,          \
                                                Zel64f* value) {                                             \
    return relative<Kind::K, true>(src1, src1Step, src2, src2Step, mask, maskStep, roiSize, value);          \
  }

// The unmasked members exist for 8u, 16u and 32f.
#define ZELCV_NORM_PLAIN_MEMBERS(Name, K, T, tn)                                                              \
  ZELCV_ENTRY(zeliNorm_##Name##_##tn##_C1R)(const T* src, int srcStep, ZeliSize roiSize, Zel64f* value) {  \
    return norm<Kind::K, false, false, false>(src, srcStep, static_cast<const T*>(nullptr), 0, nullptr, 0,  \
                                              roiSize, 0, value);                                            \
  }                                                                                                          \
  ZELCV_ENTRY(zeliNormDiff_##Name##_##tn##_C1R)(const T* src1, int src1Step, const T* src2, int src2Step,   \
                                                ZeliSize roiSize, Zel64f* value) {                           \
    return norm<Kind::K, true, false, false>(src1, src1Step, src2, src2Step, nullptr, 0, roiSize, 0, value); \
  }                                                                                                          \
  ZELCV_ENTRY(zeliNormRel_##Name##_##tn##_C1R)(const T* src1, int src1Step, const T* src2, int src2Step,    \
                                               ZeliSize roiSize, Zel64f* value) {                            \
    return relative<Kind::K, false>(src1, src1Step, src2, src2Step, nullptr, 0, roiSize, value);            \
  }

#define ZELCV_NORM_ALL(Name, K)                   \
  ZELCV_NORM_MEMBERS(Name, K, Zel8u, 8u)          \
  ZELCV_NORM_MEMBERS(Name, K, Zel8s, 8s)          \
  ZELCV_NORM_MEMBERS(Name, K, Zel16u, 16u)        \
  ZELCV_NORM_MEMBERS(Name, K, Zel32f, 32f)        \
  ZELCV_NORM_PLAIN_MEMBERS(Name, K, Zel8u, 8u)    \
  ZELCV_NORM_PLAIN_MEMBERS(Name, K, Zel16u, 16u)  \
  ZELCV_NORM_PLAIN_MEMBERS(Name, K, Zel32f, 32f)

ZELCV_NORM_ALL(Inf, Inf)
ZELCV_NORM_ALL(L1, L1)
ZELCV_NORM_ALL(L2, L2)
