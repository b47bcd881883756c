// Chamfer distance transforms (3x3 and 5x5 neighbourhoods; 8u, 16u and 32f
// results) and the standard weight tables.
//
// Each pass computes a row in blocks of one vector: first the candidates from
// the rows already finished (upper rows forward, lower rows backward), which
// are independent per pixel, then the chain along the row, v[x] =
// min(t[x], v[x -/+ 1] + a). The chain is a min-plus scan: inside a vector it
// takes log2(lanes) shifted steps, and the value carried in from the previous
// block adds a ramp. Integer sums saturate at the result's largest value,
// which makes every step an exact min(M, cost); float sums round, but
// rounding is monotone, so (min(p, q) + a) == min(p + a, q + a) and the
// scan's repeated additions give the very bits of the plain chain.
#include <float.h>
#include <stdint.h>
#include <string.h>

#include <algorithm>
#include <type_traits>

#include <emmintrin.h>

#include "core/status.h"

namespace zelcv {
namespace {

// ---- element operations ---------------------------------------------------

struct Ops8u {
  using T = uint8_t;
  using W = int;  // a weight, already clamped to kMax
  using V = __m128i;
  static constexpr int kLanes = 16;
  static constexpr T kMax = 255;
  static T add(T v, W w) { return T(std::min<int>(kMax, int(v) + w)); }
  static V vadd(V v, V w) { return _mm_adds_epu8(v, w); }
  static V vmin(V a, V b) { return _mm_min_epu8(a, b); }
  static V splat(W w) { return _mm_set1_epi8(char(w)); }
  static V load(const T* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
  static void store(T* p, V v) { _mm_storeu_si128(reinterpret_cast<__m128i*>(p), v); }
  // Lanes that hold a feature pixel (source 0) are all ones.
  static V featureMask(const uint8_t* s) { return _mm_cmpeq_epi8(load(s), _mm_setzero_si128()); }
  static V clearFeatures(V t, const uint8_t* s) { return _mm_andnot_si128(featureMask(s), t); }
  static V fill() { return _mm_set1_epi8(-1); }
  template <int n> static V up(V v) { return _mm_slli_si128(v, n); }
  template <int n> static V down(V v) { return _mm_srli_si128(v, n); }
  static V bitOr(V a, V b) { return _mm_or_si128(a, b); }
};

struct Ops16u {
  using T = uint16_t;
  using W = int;
  using V = __m128i;
  static constexpr int kLanes = 8;
  static constexpr T kMax = 65535;
  static T add(T v, W w) { return T(std::min<int>(kMax, int(v) + w)); }
  static V vadd(V v, V w) { return _mm_adds_epu16(v, w); }
  // No unsigned 16-bit min in SSE2: a - sat(a - b).
  static V vmin(V a, V b) { return _mm_sub_epi16(a, _mm_subs_epu16(a, b)); }
  static V splat(W w) { return _mm_set1_epi16(short(w)); }
  static V load(const T* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
  static void store(T* p, V v) { _mm_storeu_si128(reinterpret_cast<__m128i*>(p), v); }
  static V clearFeatures(V t, const uint8_t* s) {
    __m128i z = _mm_cmpeq_epi8(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(s)), _mm_setzero_si128());
    return _mm_andnot_si128(_mm_unpacklo_epi8(z, z), t);
  }
  static V fill() { return _mm_set1_epi8(-1); }
  template <int n> static V up(V v) { return _mm_slli_si128(v, n); }
  template <int n> static V down(V v) { return _mm_srli_si128(v, n); }
  static V bitOr(V a, V b) { return _mm_or_si128(a, b); }
};

struct Ops32f {
  using T = float;
  using W = float;
  using V = __m128;
  static constexpr int kLanes = 4;
  static constexpr T kMax = FLT_MAX;
  static T add(T v, W w) { return v + w; }
  static V vadd(V v, V w) { return _mm_add_ps(v, w); }
  static V vmin(V a, V b) { return _mm_min_ps(a, b); }
  static V splat(W w) { return _mm_set1_ps(w); }
  static V load(const T* p) { return _mm_loadu_ps(p); }
  static void store(T* p, V v) { _mm_storeu_ps(p, v); }
  static V clearFeatures(V t, const uint8_t* s) {
    int32_t four;
    memcpy(&four, s, 4);
    __m128i z = _mm_cmpeq_epi8(_mm_cvtsi32_si128(four), _mm_setzero_si128());
    z = _mm_unpacklo_epi8(z, z);
    return _mm_andnot_ps(_mm_castsi128_ps(_mm_unpacklo_epi16(z, z)), t);
  }
  // Shifted-in lanes are +infinity: neutral for min, and inf + a stays inf.
  static V fill() { return _mm_set1_ps(__builtin_inff()); }
  template <int n> static V up(V v) { return _mm_castsi128_ps(_mm_slli_si128(_mm_castps_si128(v), n)); }
  template <int n> static V down(V v) { return _mm_castsi128_ps(_mm_srli_si128(_mm_castps_si128(v), n)); }
  static V bitOr(V a, V b) { return _mm_or_ps(a, b); }
};

template <class Ops> inline typename Ops::T smin(typename Ops::T a, typename Ops::T b) { return b < a ? b : a; }

template <class Ops> struct Weights {
  typename Ops::W a, b, c;
};

// ---- candidates from a finished neighbouring row -------------------------

// The candidate at x from rows n1 (one away) and n2 (two away, 5x5 only; null
// when absent). Neighbours outside the ROI are skipped.
template <class Ops, int K>
typename Ops::T rowCandidate(const typename Ops::T* n1, const typename Ops::T* n2, int x, int w,
                             const Weights<Ops>& wt) {
  using T = typename Ops::T;
  T v = Ops::kMax;
  if (n1) {
    v = smin<Ops>(v, Ops::add(n1[x], wt.a));
    if (x >= 1) v = smin<Ops>(v, Ops::add(n1[x - 1], wt.b));
    if (x + 1 < w) v = smin<Ops>(v, Ops::add(n1[x + 1], wt.b));
    if (K == 5) {
      if (x >= 2) v = smin<Ops>(v, Ops::add(n1[x - 2], wt.c));
      if (x + 2 < w) v = smin<Ops>(v, Ops::add(n1[x + 2], wt.c));
    }
  }
  if (K == 5 && n2) {
    if (x >= 1) v = smin<Ops>(v, Ops::add(n2[x - 1], wt.c));
    if (x + 1 < w) v = smin<Ops>(v, Ops::add(n2[x + 1], wt.c));
  }
  return v;
}

// The same for one vector at x, all neighbours inside the ROI.
template <class Ops, int K>
typename Ops::V rowCandidates(const typename Ops::T* n1, const typename Ops::T* n2, int x,
                              typename Ops::V va, typename Ops::V vb, typename Ops::V vc) {
  using V = typename Ops::V;
  V v = Ops::vadd(Ops::load(n1 + x), va);
  v = Ops::vmin(v, Ops::vadd(Ops::load(n1 + x - 1), vb));
  v = Ops::vmin(v, Ops::vadd(Ops::load(n1 + x + 1), vb));
  if (K == 5) {
    v = Ops::vmin(v, Ops::vadd(Ops::load(n1 + x - 2), vc));
    v = Ops::vmin(v, Ops::vadd(Ops::load(n1 + x + 2), vc));
    if (n2) {
      v = Ops::vmin(v, Ops::vadd(Ops::load(n2 + x - 1), vc));
      v = Ops::vmin(v, Ops::vadd(Ops::load(n2 + x + 1), vc));
    }
  }
  return v;
}

// ---- the chain along a row ------------------------------------------------

// steps[k] = a added 2^k times; ramp[i] = the carried value's weight for lane i.
template <class Ops> struct Scan {
  typename Ops::V steps[4];
  typename Ops::W ramp[Ops::kLanes + 1];  // ramp[i] = a added i times (integers: saturated)
};

template <class Ops> Scan<Ops> makeScan(typename Ops::W a) {
  Scan<Ops> s;
  typename Ops::W r = 0;
  s.ramp[0] = 0;
  for (int i = 1; i <= Ops::kLanes; ++i) {
    if constexpr (std::is_same<Ops, Ops32f>::value)
      r = r + a;
    else
      r = std::min<int>(Ops::kMax, r + a);
    s.ramp[i] = r;
  }
  for (int k = 0; k < 4; ++k) s.steps[k] = Ops::splat(a);
  return s;
}

// Adds a to every lane n times (float: one rounding per addition, as the
// plain chain does; integers: once, saturated).
template <class Ops, int n> typename Ops::V addTimes(typename Ops::V v, const Scan<Ops>& s) {
  if constexpr (std::is_same<Ops, Ops32f>::value) {
    for (int i = 0; i < n; ++i) v = Ops::vadd(v, s.steps[0]);
    return v;
  } else {
    return Ops::vadd(v, Ops::splat(s.ramp[n]));
  }
}

// Forward scan inside a vector: lane i becomes min over k <= i of t[i - k] + k a.
template <class Ops> typename Ops::V scanForward(typename Ops::V v, const Scan<Ops>& s) {
  using L = Ops;
  constexpr int e = 16 / Ops::kLanes;  // bytes per lane
  const typename Ops::V fill = Ops::fill();
  v = Ops::vmin(v, addTimes<Ops, 1>(L::bitOr(L::template up<e>(v), L::template down<16 - e>(fill)), s));
  v = Ops::vmin(v, addTimes<Ops, 2>(L::bitOr(L::template up<2 * e>(v), L::template down<16 - 2 * e>(fill)), s));
  if constexpr (Ops::kLanes >= 8)
    v = Ops::vmin(v, addTimes<Ops, 4>(L::bitOr(L::template up<4 * e>(v), L::template down<16 - 4 * e>(fill)), s));
  if constexpr (Ops::kLanes >= 16)
    v = Ops::vmin(v, addTimes<Ops, 8>(L::bitOr(L::template up<8 * e>(v), L::template down<16 - 8 * e>(fill)), s));
  return v;
}

template <class Ops> typename Ops::V scanBackward(typename Ops::V v, const Scan<Ops>& s) {
  using L = Ops;
  constexpr int e = 16 / Ops::kLanes;
  const typename Ops::V fill = Ops::fill();
  v = Ops::vmin(v, addTimes<Ops, 1>(L::bitOr(L::template down<e>(v), L::template up<16 - e>(fill)), s));
  v = Ops::vmin(v, addTimes<Ops, 2>(L::bitOr(L::template down<2 * e>(v), L::template up<16 - 2 * e>(fill)), s));
  if constexpr (Ops::kLanes >= 8)
    v = Ops::vmin(v, addTimes<Ops, 4>(L::bitOr(L::template down<4 * e>(v), L::template up<16 - 4 * e>(fill)), s));
  if constexpr (Ops::kLanes >= 16)
    v = Ops::vmin(v, addTimes<Ops, 8>(L::bitOr(L::template down<8 * e>(v), L::template up<16 - 8 * e>(fill)), s));
  return v;
}

// Folds the value carried in from the previous block into a scanned block of
// `t` values (stored in `out`). The carry matters only when carry + a beats
// the block's first lane; otherwise every later lane already holds less than
// the carry could give it.
template <class Ops>
typename Ops::T foldCarry(typename Ops::T* out, typename Ops::T carry, const Scan<Ops>& s, bool forward) {
  using T = typename Ops::T;
  constexpr int n = Ops::kLanes;
  const T first = forward ? out[0] : out[n - 1];
  T c = Ops::add(carry, s.ramp[1]);
  if (!(c < first)) return forward ? out[n - 1] : out[0];
  if constexpr (std::is_same<Ops, Ops32f>::value) {
    // Float: the chain's own additions, lane by lane.
    if (forward)
      for (int i = 0; i < n; ++i) {
        out[i] = smin<Ops>(out[i], c);
        c = out[i] + s.ramp[1];
      }
    else
      for (int i = n - 1; i >= 0; --i) {
        out[i] = smin<Ops>(out[i], c);
        c = out[i] + s.ramp[1];
      }
  } else {
    for (int i = 0; i < n; ++i) {
      const int k = forward ? i + 1 : n - i;
      out[i] = smin<Ops>(out[i], Ops::add(carry, s.ramp[k]));
    }
  }
  return forward ? out[n - 1] : out[0];
}

// ---- the passes -------------------------------------------------------------

template <class Ops, int K>
void forwardRow(const uint8_t* s, typename Ops::T* d, const typename Ops::T* u1, const typename Ops::T* u2,
                int w, const Weights<Ops>& wt, const Scan<Ops>& scan) {
  using T = typename Ops::T;
  using V = typename Ops::V;
  constexpr int n = Ops::kLanes, r = K / 2;
  const V va = Ops::splat(wt.a), vb = Ops::splat(wt.b), vc = Ops::splat(wt.c);
  alignas(16) T block[n];
  T carry = Ops::kMax;
  bool haveCarry = false;
  int x = 0;
  for (; x + n <= w; x += n) {
    V t;
    if (u1 && x >= r && x + n + r <= w) {
      t = rowCandidates<Ops, K>(u1, u2, x, va, vb, vc);
    } else {
      for (int i = 0; i < n; ++i) block[i] = rowCandidate<Ops, K>(u1, u2, x + i, w, wt);
      t = Ops::load(block);
    }
    t = scanForward<Ops>(Ops::clearFeatures(t, s + x), scan);
    Ops::store(block, t);
    carry = haveCarry ? foldCarry<Ops>(block, carry, scan, true) : block[n - 1];
    haveCarry = true;
    memcpy(d + x, block, sizeof(block));
  }
  for (; x < w; ++x) {
    T v = s[x] == 0 ? T(0) : rowCandidate<Ops, K>(u1, u2, x, w, wt);
    if (s[x] != 0 && haveCarry) v = smin<Ops>(v, Ops::add(carry, wt.a));
    d[x] = carry = v;
    haveCarry = true;
  }
}

template <class Ops, int K>
void backwardRow(typename Ops::T* d, const typename Ops::T* l1, const typename Ops::T* l2, int w,
                 const Weights<Ops>& wt, const Scan<Ops>& scan) {
  using T = typename Ops::T;
  using V = typename Ops::V;
  constexpr int n = Ops::kLanes, r = K / 2;
  const V va = Ops::splat(wt.a), vb = Ops::splat(wt.b), vc = Ops::splat(wt.c);
  alignas(16) T block[n];
  T carry = Ops::kMax;
  bool haveCarry = false;
  int x = w;
  for (; x - n >= 0; x -= n) {
    const int x0 = x - n;
    V t = Ops::load(d + x0);
    if (l1) {
      if (x0 >= r && x + r <= w) {
        t = Ops::vmin(t, rowCandidates<Ops, K>(l1, l2, x0, va, vb, vc));
      } else {
        for (int i = 0; i < n; ++i) block[i] = rowCandidate<Ops, K>(l1, l2, x0 + i, w, wt);
        t = Ops::vmin(t, Ops::load(block));
      }
    }
    t = scanBackward<Ops>(t, scan);
    Ops::store(block, t);
    carry = haveCarry ? foldCarry<Ops>(block, carry, scan, false) : block[0];
    haveCarry = true;
    memcpy(d + x0, block, sizeof(block));
  }
  for (--x; x >= 0; --x) {
    T v = d[x];
    if (l1) v = smin<Ops>(v, rowCandidate<Ops, K>(l1, l2, x, w, wt));
    if (haveCarry) v = smin<Ops>(v, Ops::add(carry, wt.a));
    d[x] = carry = v;
    haveCarry = true;
  }
}

template <typename T> T* rowOf(T* base, int step, int y) {
  return reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(base) + int64_t(step) * y);
}
template <typename T> const T* rowOf(const T* base, int step, int y) {
  return reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(base) + int64_t(step) * y);
}

template <class Ops, int K>
void chamfer(const uint8_t* src, int srcStep, typename Ops::T* dst, int dstStep, ZeliSize roi, Weights<Ops> wt) {
  using T = typename Ops::T;
  const int w = roi.width, h = roi.height;
  // An orthogonal step dearer than a diagonal one: zig-zags of diagonal steps
  // undercut it wherever there is room, so the passes count every step as
  // diagonal and a knight step as two; cheaper knight steps would need paths
  // that go down and up again, which two passes cannot follow near the edges.
  if (wt.a > wt.b && w >= 2 && h >= 2) {
    wt.a = wt.b;
    wt.c = typename Ops::W(Ops::add(typename Ops::T(wt.b), wt.b));
  }
  const Scan<Ops> scan = makeScan<Ops>(wt.a);
  for (int y = 0; y < h; ++y)
    forwardRow<Ops, K>(rowOf(src, srcStep, y), rowOf(dst, dstStep, y), y >= 1 ? rowOf(dst, dstStep, y - 1) : nullptr,
                       K == 5 && y >= 2 ? rowOf(dst, dstStep, y - 2) : nullptr, w, wt, scan);
  for (int y = h - 1; y >= 0; --y)
    backwardRow<Ops, K>(rowOf(dst, dstStep, y), y + 1 < h ? rowOf(dst, dstStep, y + 1) : static_cast<T*>(nullptr),
                        K == 5 && y + 2 < h ? rowOf(dst, dstStep, y + 2) : nullptr, w, wt, scan);
}

// ---- the entries --------------------------------------------------------------

template <class Ops, int K>
ZelStatus integerChamfer(const Zel8u* src, int srcStep, typename Ops::T* dst, int dstStep, ZeliSize roi,
                         const Zel32s* metrics) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep)}, roi, {metrics})) return s;
  for (int i = 0; i < (K == 5 ? 3 : 2); ++i)
    if (metrics[i] < 1) return zelStatusBadMetrics;
  // A weight of M or more saturates every sum it enters.
  auto clamp = [](Zel32s v) { return int(std::min<Zel32s>(v, Ops::kMax)); };
  Weights<Ops> wt = {clamp(metrics[0]), clamp(metrics[1]), K == 5 ? clamp(metrics[2]) : int(Ops::kMax)};
  chamfer<Ops, K>(src, srcStep, dst, dstStep, roi, wt);
  return zelStatusOk;
}

template <int K>
ZelStatus floatChamfer(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roi,
                       const Zel32f* metrics) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep)}, roi, {metrics})) return s;
  for (int i = 0; i < (K == 5 ? 3 : 2); ++i)
    if (!(metrics[i] > 0.0f)) return zelStatusBadMetrics;
  Weights<Ops32f> wt = {metrics[0], metrics[1], K == 5 ? metrics[2] : FLT_MAX};
  chamfer<Ops32f, K>(src, srcStep, dst, dstStep, roi, wt);
  return zelStatusOk;
}

// Rows: kerSize 3 then 5; norms 0, 1, 2.
const Zel32s kMask32s[2][3][3] = {{{1, 1, 0}, {1, 2, 0}, {2, 3, 0}}, {{1, 1, 2}, {1, 2, 3}, {5, 7, 11}}};
const Zel32f kMask32f[2][3][3] = {{{1.0f, 1.0f, 0.0f}, {1.0f, 2.0f, 0.0f}, {0.955f, 1.3693f, 0.0f}},
                                  {{1.0f, 1.0f, 2.0f}, {1.0f, 2.0f, 3.0f}, {1.0f, 1.4f, 2.1969f}}};

template <typename T>
ZelStatus getMask(int kerSize, int norm, T* metrics, const T (&table)[2][3][3]) {
  if (!metrics) return zelStatusNullPointer;
  if (kerSize != 3 && kerSize != 5) return zelStatusBadSize;
  if (norm < 0 || norm > 2) return zelStatusBadArgument;
  const int index = norm + 10 * kerSize - 30;  // 0..2 and 20..22
  if (index != norm && index != 20 + norm) return zelStatusOutOfRange;
  const T* w = table[kerSize == 5][norm];
  for (int i = 0; i < kerSize / 2 + 1; ++i) metrics[i] = w[i];
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliGetDistanceTransformMask_32s)(int kerSize, int norm, Zel32s* metrics) {
  return getMask(kerSize, norm, metrics, kMask32s);
}

ZELCV_ENTRY(zeliGetDistanceTransformMask_32f)(int kerSize, int norm, Zel32f* metrics) {
  return getMask(kerSize, norm, metrics, kMask32f);
}

ZELCV_ENTRY(zeliGetDistanceTransformMask)(int maskType, Zel32f* metrics) {
  if (!metrics) return zelStatusNullPointer;
  const int norm = maskType % 10;
  if (norm < 0 || norm > 2) return zelStatusBadArgument;
  return getMask(maskType / 10, norm, metrics, kMask32f);
}

ZELCV_ENTRY(zeliDistanceTransform_3x3_8u_C1R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                              ZeliSize roiSize, const Zel32s* metrics) {
  return integerChamfer<Ops8u, 3>(src, srcStep, dst, dstStep, roiSize, metrics);
}

ZELCV_ENTRY(zeliDistanceTransform_3x3_8u_C1IR)(Zel8u* srcDst, int srcDstStep, ZeliSize roiSize,
                                               const Zel32s* metrics) {
  return integerChamfer<Ops8u, 3>(srcDst, srcDstStep, srcDst, srcDstStep, roiSize, metrics);
}

ZELCV_ENTRY(zeliDistanceTransform_3x3_8u16u_C1R)(const Zel8u* src, int srcStep, Zel16u* dst, int dstStep,
                                                 ZeliSize roiSize, const Zel32s* metrics) {
  return integerChamfer<Ops16u, 3>(src, srcStep, dst, dstStep, roiSize, metrics);
}

ZELCV_ENTRY(zeliDistanceTransform_3x3_8u32f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                                 ZeliSize roiSize, const Zel32f* metrics) {
  return floatChamfer<3>(src, srcStep, dst, dstStep, roiSize, metrics);
}

ZELCV_ENTRY(zeliDistanceTransform_5x5_8u_C1R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                              ZeliSize roiSize, const Zel32s* metrics) {
  return integerChamfer<Ops8u, 5>(src, srcStep, dst, dstStep, roiSize, metrics);
}

ZELCV_ENTRY(zeliDistanceTransform_5x5_8u_C1IR)(Zel8u* srcDst, int srcDstStep, ZeliSize roiSize,
                                               const Zel32s* metrics) {
  return integerChamfer<Ops8u, 5>(srcDst, srcDstStep, srcDst, srcDstStep, roiSize, metrics);
}

ZELCV_ENTRY(zeliDistanceTransform_5x5_8u16u_C1R)(const Zel8u* src, int srcStep, Zel16u* dst, int dstStep,
                                                 ZeliSize roiSize, const Zel32s* metrics) {
  return integerChamfer<Ops16u, 5>(src, srcStep, dst, dstStep, roiSize, metrics);
}

ZELCV_ENTRY(zeliDistanceTransform_5x5_8u32f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                                 ZeliSize roiSize, const Zel32f* metrics) {
  return floatChamfer<5>(src, srcStep, dst, dstStep, roiSize, metrics);
}
