// Inner loops of the separable pipeline. One span routine computes
//   out[i] = convert(sum_k tap[k] * source(k)[i]),  i = 0 .. n-1,
// where source(k) is the row shifted by k pixels (row pass) or the k-th row
// pointer (column pass). An arithmetic policy says how a sum is formed and
// converted; the vector block and the scalar tail of each policy add the
// same products in the same order (tap 0 first, no leading zero), so every
// path, every alignment, every vector width and both x86 targets give the
// same bits.
//
// The policies are written once over the instruction set: Wide<Isa> holds
// the few vector operations they use, as 128-bit SSE2 in sepfilter_wide.h, as 256-bit AVX2
// in sepfilter_avx2.cpp and, for the 32f policies, as 512-bit AVX-512 in
// sepfilter_avx512.cpp; each of those files alone builds its instances.
#ifndef ZELCV_FILTER_SEPFILTER_KERNELS_H
#define ZELCV_FILTER_SEPFILTER_KERNELS_H

#include <emmintrin.h>
#include <stdint.h>

#include <type_traits>
#include <utility>

#include "filter/sepfilter_wide.h"
#include "kernels/dispatch.h"
#include "kernels/simd.h"

namespace zelcv {
namespace sep {

// ---- arithmetic policies ---------------------------------------------------
//
// Each policy is a template over the instruction set; `to<I>()` gives the
// same policy (same parameters) for instruction set I.

// Integer data, single-precision taps (already scaled by 1/divisor), single
// precision sum, clamp, then truncation (row pass) or rounding to nearest
// even (column pass).
template <typename S, typename D, bool kRound, typename Isa = simd::Sse2>
struct FloatSum {
  using W = Wide<Isa>;
  using Source = S;
  using Out = D;
  using V = typename W::F;
  using A = float;
  using TapType = float;
  using Prepared = __m128;
  static constexpr int kBlock = 2 * W::kFloats;
  template <class I> FloatSum<S, D, kRound, I> to() const { return {}; }
  struct Tap {  // one tap of the call, from the integer kernel
    template <typename T> static A make(T tap, float scale) { return static_cast<float>(tap) * scale; }
    static V broadcast(A a) { return W::setf(a); }
    static V prepared(const Prepared* p) { return W::tapf(p); }
    static A lane0(V v) { return W::firstf(v); }
  };

  template <class Src, class Taps>
  static void block(const Src& src, int i, D* out, const Taps& taps, int n) {
    V a0, a1, p0, p1;
    toFloats<W>(src.at(0) + i, p0, p1);
    a0 = W::mulf(taps.vec(0), p0);
    a1 = W::mulf(taps.vec(0), p1);
    for (int k = 1; k < n; ++k) {
      toFloats<W>(src.at(k) + i, p0, p1);
      a0 = W::addf(a0, W::mulf(taps.vec(k), p0));
      a1 = W::addf(a1, W::mulf(taps.vec(k), p1));
    }
    const V lo = W::setf(Range<D>::lo), hi = W::setf(Range<D>::hi);
    a0 = W::minf(W::maxf(a0, lo), hi);
    a1 = W::minf(W::maxf(a1, lo), hi);
    if (kRound)
      storePair<W>(out, W::roundToInt(a0), W::roundToInt(a1));
    else
      storePair<W>(out, W::truncToInt(a0), W::truncToInt(a1));
  }

  template <class Src, class Taps>
  static D one(const Src& src, int i, const Taps& t, int n) {
    float acc = t.scalar(0) * static_cast<float>(src.at(0)[i]);
    for (int k = 1; k < n; ++k) acc += t.scalar(k) * static_cast<float>(src.at(k)[i]);
    acc = clampLikeVector(acc, Range<D>::lo, Range<D>::hi);
    return static_cast<D>(kRound ? _mm_cvtss_si32(_mm_set_ss(acc)) : _mm_cvttss_si32(_mm_set_ss(acc)));
  }
};

// Vector lanes of the accumulator type of the 32f members.
template <typename Acc, class W> struct Lanes;
template <class W> struct Lanes<double, W> {
  using V = typename W::D;
  using TapType = double;
  using Prepared = __m128d;
  static constexpr int kCount = W::kFloats / 2;
  static V load(const float* p) { return W::widen(p); }
  template <int r> static V shift(V lo, V hi) { return W::template shiftd<r>(lo, hi); }
  static V mul(V a, V b) { return W::muld(a, b); }
  // acc + a x b for a float tap and a float pixel widened to double.
  static V addProduct(V acc, V a, V b) { return W::addExactProductd(acc, a, b); }
  static V set1(double a) { return W::setd(a); }
  static V prepared(const Prepared* p) { return W::tapd(p); }
  static double lane0(V v) { return W::firstd(v); }
  static void store(float* out, V a0, V a1) { W::storeNarrowed(out, a0, a1); }
};
template <class W> struct Lanes<float, W> {
  using V = typename W::F;
  using TapType = float;
  using Prepared = __m128;
  static constexpr int kCount = W::kFloats;
  static V load(const float* p) { return W::loadf(p); }
  static V mul(V a, V b) { return W::mulf(a, b); }
  static V addProduct(V acc, V a, V b) { return W::addf(acc, W::mulf(a, b)); }
  static V set1(float a) { return W::setf(a); }
  static V prepared(const Prepared* p) { return W::tapf(p); }
  static float lane0(V v) { return W::firstf(v); }
  static void store(float* out, V a0, V a1) {
    W::storef(out, a0);
    W::storef(out + kCount, a1);
  }
};

// 32f members: no divisor; products and sum in `Acc` (double for the row
// pass, one rounding to float at the end; float for the column pass). A
// block is four vectors: four independent chains of additions keep the
// adders busy despite their latency, and the sums, the tap and a temporary
// still fit in the eight registers of 32-bit code.
template <typename Acc, typename Isa = simd::Sse2>
struct FloatDataSum {
  using L = Lanes<Acc, Wide<Isa>>;
  using Source = float;
  using Out = float;
  using V = typename L::V;
  using A = Acc;
  using TapType = typename L::TapType;
  using Prepared = typename L::Prepared;
  static constexpr int kBlock = 4 * L::kCount;
  template <class I> FloatDataSum<Acc, I> to() const { return {}; }
  struct Tap {
    static A make(float tap, float) { return tap; }
    static V broadcast(A a) { return L::set1(a); }
    static V prepared(const Prepared* p) { return L::prepared(p); }
    static A lane0(V v) { return L::lane0(v); }
  };

  template <class Src, class Taps>
  static void block(const Src& src, int i, float* out, const Taps& taps, int n) {
    const float* p = src.at(0) + i;
    V t = taps.vec(0);
    V a0 = L::mul(t, L::load(p)), a1 = L::mul(t, L::load(p + L::kCount));
    V a2 = L::mul(t, L::load(p + 2 * L::kCount)), a3 = L::mul(t, L::load(p + 3 * L::kCount));
    for (int k = 1; k < n; ++k) {
      p = src.at(k) + i;
      t = taps.vec(k);
      a0 = L::addProduct(a0, t, L::load(p));
      a1 = L::addProduct(a1, t, L::load(p + L::kCount));
      a2 = L::addProduct(a2, t, L::load(p + 2 * L::kCount));
      a3 = L::addProduct(a3, t, L::load(p + 3 * L::kCount));
    }
    L::store(out, a0, a1);
    L::store(out + 2 * L::kCount, a2, a3);
  }

  // Rows of one or three channels with a size known at compile time: each
  // element is widened once and the window of every tap is cut from two
  // neighbouring widened vectors, one shuffle (two on AVX2) where widening
  // every tap's window anew costs a conversion per tap. The sums are those
  // of the block above, term for term.
  template <int N, class Taps>
  static void block(const FixedRowSource<float, N>& src, int i, float* out, const Taps& taps, int n) {
    if constexpr (std::is_same<Acc, double>::value) {
      if (src.stride == 1) return slidingBlock<N, 1>(src.base + i, out, taps);
      if (src.stride == 3) return slidingBlock<N, 3>(src.base + i, out, taps);
    }
    block(static_cast<const RowSource<float>&>(src), i, out, taps, n);
  }

  template <class Src, class Taps>
  static float one(const Src& src, int i, const Taps& t, int n) {
    Acc acc = t.scalar(0) * static_cast<Acc>(src.at(0)[i]);
    for (int k = 1; k < n; ++k) acc += t.scalar(k) * static_cast<Acc>(src.at(k)[i]);
    return static_cast<float>(acc);
  }

 private:
  // The window of tap K for output vector J: elements o .. o + kCount - 1
  // with o = J kCount + K S, where c[m] holds elements m kCount on.
  template <int S, int J, int K>
  static V window(const V* c) {
    constexpr int o = J * L::kCount + K * S, m = o / L::kCount, r = o % L::kCount;
    if constexpr (r == 0)
      return c[m];
    else
      return L::template shift<r>(c[m], c[m + 1]);
  }
  template <int S, int J, class Taps, int... K>
  static V slidingSum(const V* c, const Taps& taps, std::integer_sequence<int, 0, K...>) {
    V a = L::mul(taps.vec(0), window<S, J, 0>(c));
    ((a = L::addProduct(a, taps.vec(K), window<S, J, K>(c))), ...);
    return a;
  }
  // Vector M of the widened elements. The four output vectors need the
  // elements up to kNeeded - 1 only; where the last vector would reach past
  // them, it is loaded to end at the last needed element and moved into
  // place, so that a block never reads beyond the row's reach (the row may
  // end at an inaccessible page). Its lanes past the needed ones are never
  // used by a window.
  template <int kNeeded, int M>
  static V widened(const float* p) {
    constexpr int over = (M + 1) * L::kCount - kNeeded;
    if constexpr (over <= 0) {
      return L::load(p + M * L::kCount);
    } else {
      const V tail = L::load(p + kNeeded - L::kCount);
      return L::template shift<over>(tail, tail);
    }
  }
  template <int N, int S, class Taps, int... M>
  static void slidingBlock(const float* p, float* out, const Taps& taps, std::integer_sequence<int, M...>) {
    constexpr int kNeeded = 4 * L::kCount + (N - 1) * S;
    const V c[] = {widened<kNeeded, M>(p)...};
    using TapIndices = std::make_integer_sequence<int, N>;
    L::store(out, slidingSum<S, 0>(c, taps, TapIndices{}), slidingSum<S, 1>(c, taps, TapIndices{}));
    L::store(out + 2 * L::kCount, slidingSum<S, 2>(c, taps, TapIndices{}), slidingSum<S, 3>(c, taps, TapIndices{}));
  }
  template <int N, int S, class Taps>
  static void slidingBlock(const float* p, float* out, const Taps& taps) {
    // The source rows come from memory once each, and the sums leave the
    // loads too little time to overlap on their own: ask 2 KiB ahead.
    for (int b = 0; b < 4 * L::kCount; b += 16) _mm_prefetch(reinterpret_cast<const char*>(p + 512 + b), _MM_HINT_T0);
    // Four output vectors need the elements up to 3 kCount + (N - 1) S.
    constexpr int kWidened = 4 + ((N - 1) * S + L::kCount - 1) / L::kCount;
    slidingBlock<N, S>(p, out, taps, std::make_integer_sequence<int, kWidened>{});
  }
};
using DoubleSum = FloatDataSum<double>;
using SingleSum = FloatDataSum<float>;

// Fixed-point scaling of the _Low members: r = trunc(16384 / divisor) as a
// 16-bit integer; a divisor of 1 skips it.
struct LowScale {
  int r = 0;
  bool unit = true;
  static LowScale of(int divisor) {
    LowScale s;
    s.unit = divisor == 1;
    // The scale is made before the checks run; a divisor of 0, refused
    // there, must not reach the conversion (16384 / 0 has no integer value).
    if (!s.unit && divisor != 0) s.r = static_cast<int16_t>(static_cast<int>(16384.0f / static_cast<float>(divisor)));
    return s;
  }
  // floor(sum * r / 2^14) saturated to 16 bits, the product taken exactly.
  template <class W> int16_t one(int32_t sum) const {
    int64_t v = unit ? sum : (static_cast<int64_t>(sum) * r) >> 14;
    return static_cast<int16_t>(v < -32768 ? -32768 : v > 32767 ? 32767 : v);
  }
  // The same for a vector of sums. The sum is split as hi * 2^16 + lo (lo
  // unsigned) so that pmaddwd forms hi * r and lo * r exactly; then
  // floor(sum * r / 2^14) = 4 * hi * r + floor(lo * r / 2^14). hi * r is
  // clamped to +-2^15 first, which cannot move a result across the 16-bit
  // saturation limits but keeps 4 * hi * r inside 32 bits. 2r fits 16 bits
  // because r = 16384 only arises from divisor 1, which skips r.
  template <class W> typename W::I apply(typename W::I sum) const {
    if (unit) return sum;
    const auto hiMul = W::set32(static_cast<int>(static_cast<uint32_t>(static_cast<uint16_t>(r)) << 16));
    const auto loMul = W::set32(static_cast<int>(static_cast<uint16_t>(2 * r) |
                                                 (static_cast<uint32_t>(static_cast<uint16_t>(r)) << 16)));
    auto hr = W::madd16(sum, hiMul);
    auto loHalf = W::template srli32<17>(W::template slli32<16>(sum));
    auto loBit = W::template slli32<16>(W::bitAnd(sum, W::set32(1)));
    auto lr = W::madd16(W::bitOr(loHalf, loBit), loMul);
    hr = W::max32(W::min32(hr, W::set32(32768)), W::set32(-32768));
    return W::add32(W::template slli32<2>(hr), W::template srai32<14>(lr));
  }
};

// Integer taps of the integer policies.
template <class W>
struct IntegerTap {
  using V = typename W::I;
  static int make(int16_t tap, float) { return tap; }
  static V broadcast(int a) { return W::set16(a); }
  static V prepared(const __m128i* p) { return W::tap16(p); }
  static int lane0(V v) { return W::first16(v); }
};

// _Low 16s: integer products summed in 32 bits (wrapping), then LowScale.
template <typename Isa = simd::Sse2>
struct LowSum {
  using W = Wide<Isa>;
  using Source = int16_t;
  using Out = int16_t;
  using V = typename W::I;
  using A = int;
  using TapType = int16_t;
  using Prepared = __m128i;
  using Tap = IntegerTap<W>;
  static constexpr int kBlock = 2 * W::kFloats;
  LowScale scale;
  template <class I> LowSum<I> to() const { return {scale}; }

  template <class Src, class Taps>
  void block(const Src& src, int i, int16_t* out, const Taps& taps, int n) const {
    V a0 = W::zero(), a1 = W::zero();
    for (int k = 0; k < n; ++k) {
      V v = W::loadi(src.at(k) + i);
      const V t = taps.vec(k);
      V lo = W::mullo16(v, t), hi = W::mulhi16(v, t);
      a0 = W::add32(a0, W::lo16(lo, hi));
      a1 = W::add32(a1, W::hi16(lo, hi));
    }
    W::storei(out, W::packs32(scale.template apply<W>(a0), scale.template apply<W>(a1)));
  }

  template <class Src, class Taps>
  int16_t one(const Src& src, int i, const Taps& t, int n) const {
    uint32_t acc = 0;  // wraps like the vector lanes
    for (int k = 0; k < n; ++k) acc += static_cast<uint32_t>(t.scalar(k) * src.at(k)[i]);
    return scale.template one<W>(static_cast<int32_t>(acc));
  }
};

// ---- exact integer forms of the single-precision contract ------------------
//
// When the divisor is a power of two (either sign) and sum|tap| x max|pixel|
// < 2^24, every scaled tap, product and partial sum that FloatSum forms is an
// exact float, so its sum is exactly (integer sum) x (1/divisor) whatever the
// order. The policies below form that integer sum with integer instructions
// and convert it once: the same bits as FloatSum with fewer instructions.

inline bool exactInFloat(const int16_t* kernel, int count, int divisor, int64_t maxAbs, int64_t* tapSum) {
  const int64_t d = divisor < 0 ? -int64_t(divisor) : divisor;
  if (d == 0 || (d & (d - 1)) != 0) return false;
  int64_t sum = 0;
  for (int k = 0; k < count && sum * maxAbs < (int64_t(1) << 24); ++k) sum += kernel[k] < 0 ? -kernel[k] : kernel[k];
  *tapSum = sum;
  return sum * maxAbs < (int64_t(1) << 24);
}

// Converts exact integer sums to the output as FloatSum would.
template <class W, typename D, bool kRound>
inline D convertExact(int32_t sum, float scale) {
  float v = clampLikeVector(static_cast<float>(sum) * scale, Range<D>::lo, Range<D>::hi);
  return static_cast<D>(kRound ? _mm_cvtss_si32(_mm_set_ss(v)) : _mm_cvttss_si32(_mm_set_ss(v)));
}
// |sum| < 2^24, so sum x scale converts without overflow, and since the
// clamp limits are integers, clamping before the conversion equals the
// saturation of the packing stores after it.
template <class W, typename D, bool kRound>
inline void storeExact(D* out, typename W::I a0, typename W::I a1, float scale) {
  const typename W::F f = W::setf(scale);
  typename W::F v0 = W::mulf(W::toFloat(a0), f);
  typename W::F v1 = W::mulf(W::toFloat(a1), f);
  if (kRound)
    storePair<W>(out, W::roundToInt(v0), W::roundToInt(v1));
  else
    storePair<W>(out, W::truncToInt(v0), W::truncToInt(v1));
}

// 32-bit sums from pmaddwd over pairs of taps: `pairs[j]` holds taps 2j and
// 2j+1 in every 32-bit lane (the odd last tap pairs with 0).
template <typename S, typename D, bool kRound, typename Isa = simd::Sse2>
struct PairSum {
  using W = Wide<Isa>;
  using Source = S;
  using Out = D;
  using V = typename W::I;
  using A = int;
  using Tap = IntegerTap<W>;
  static constexpr int kBlock = 2 * W::kFloats;
  const __m128i* pairs;
  float scale;
  template <class I> PairSum<S, D, kRound, I> to() const { return {pairs, scale}; }

  static void preparePairs(const int16_t* kernel, int count, __m128i* pairs) {
    for (int k = 0; k < count; k += 2) {
      uint32_t lo = static_cast<uint16_t>(kernel[k]);
      uint32_t hi = k + 1 < count ? static_cast<uint16_t>(kernel[k + 1]) : 0u;
      pairs[k / 2] = _mm_set1_epi32(static_cast<int>(lo | (hi << 16)));
    }
  }

  template <class Src, class Taps>
  void block(const Src& src, int i, D* out, const Taps&, int n) const {
    V a0 = W::zero(), a1 = W::zero();
    int k = 0;
    for (; k + 1 < n; k += 2) {
      const V p = to16<W>(src.at(k) + i), q = to16<W>(src.at(k + 1) + i), t = W::tap32(pairs + k / 2);
      a0 = W::add32(a0, W::madd16(W::lo16(p, q), t));
      a1 = W::add32(a1, W::madd16(W::hi16(p, q), t));
    }
    if (k < n) {
      const V p = to16<W>(src.at(k) + i), t = W::tap32(pairs + k / 2);
      a0 = W::add32(a0, W::madd16(W::lo16(p, W::zero()), t));
      a1 = W::add32(a1, W::madd16(W::hi16(p, W::zero()), t));
    }
    storeExact<W, D, kRound>(out, a0, a1, scale);
  }

  template <class Src, class Taps>
  D one(const Src& src, int i, const Taps& t, int n) const {
    int32_t sum = 0;
    for (int k = 0; k < n; ++k) sum += t.scalar(k) * static_cast<int32_t>(src.at(k)[i]);
    return convertExact<W, D, kRound>(sum, scale);
  }
};

// 8-bit rows into 16-bit results with 16-bit sums, for taps small enough
// that sum|tap| x 255 fits 15 bits (then no product or sum can wrap).
template <typename Isa = simd::Sse2>
struct ShortSum {
  using W = Wide<Isa>;
  using Source = uint8_t;
  using Out = int16_t;
  using V = typename W::I;
  using A = int;
  using TapType = int16_t;
  using Prepared = __m128i;
  using Tap = IntegerTap<W>;
  static constexpr int kHalf = 2 * W::kFloats;  // 16-bit lanes per vector
  static constexpr int kBlock = 2 * kHalf;
  float scale;
  bool unit;  // divisor 1: the sum is the result
  template <class I> ShortSum<I> to() const { return {scale, unit}; }

  template <class Src, class Taps>
  void block(const Src& src, int i, int16_t* out, const Taps& taps, int n) const {
    V a0 = W::zero(), a1 = W::zero();
    for (int k = 0; k < n; ++k) {
      V v0, v1;
      W::widenBytes2(src.at(k) + i, v0, v1);
      const V t = taps.vec(k);
      a0 = W::add16(a0, W::mullo16(v0, t));
      a1 = W::add16(a1, W::mullo16(v1, t));
    }
    if (unit) {
      W::storei(out, a0);
      W::storei(out + kHalf, a1);
      return;
    }
    storeExact<W, int16_t, false>(out, W::template srai32<16>(W::lo16(a0, a0)),
                                  W::template srai32<16>(W::hi16(a0, a0)), scale);
    storeExact<W, int16_t, false>(out + kHalf, W::template srai32<16>(W::lo16(a1, a1)),
                                  W::template srai32<16>(W::hi16(a1, a1)), scale);
  }

  template <class Src, class Taps>
  int16_t one(const Src& src, int i, const Taps& t, int n) const {
    int32_t sum = 0;
    for (int k = 0; k < n; ++k) sum += t.scalar(k) * static_cast<int32_t>(src.at(k)[i]);
    return convertExact<W, int16_t, false>(sum, scale);
  }
};

// 8-bit rows into 16-bit results for taps that are all >= 0 with
// sum x 255 < 2^16 and a divisor 2^shift, shift >= 1: every sum is exact in
// unsigned 16-bit lanes (additions wrap, but the true sum fits), and the
// truncated quotient of a non-negative sum is the logical shift, at most
// 32767. These are the single-precision results, which are exact here too.
template <typename Isa = simd::Sse2>
struct ShiftSum {
  using W = Wide<Isa>;
  using Source = uint8_t;
  using Out = int16_t;
  using V = typename W::I;
  using A = int;
  using TapType = int16_t;
  using Prepared = __m128i;
  using Tap = IntegerTap<W>;
  static constexpr int kHalf = 2 * W::kFloats;  // 16-bit lanes per vector
  static constexpr int kBlock = 2 * kHalf;
  int shift;
  template <class I> ShiftSum<I> to() const { return {shift}; }

  // Whether the form applies to these taps and this divisor.
  static bool fits(const int16_t* kernel, int count, int divisor, int* shift) {
    if (divisor < 2 || (divisor & (divisor - 1)) != 0) return false;
    int64_t sum = 0;
    for (int k = 0; k < count; ++k) {
      if (kernel[k] < 0) return false;
      sum += kernel[k];
    }
    if (sum * 255 > 65535) return false;
    int s = 0;
    while ((1 << s) < divisor) ++s;
    *shift = s;
    return true;
  }

  template <class Src, class Taps>
  void block(const Src& src, int i, int16_t* out, const Taps& taps, int n) const {
    V a0 = W::zero(), a1 = W::zero();
    for (int k = 0; k < n; ++k) {
      V v0, v1;
      W::widenBytes2(src.at(k) + i, v0, v1);
      const V t = taps.vec(k);
      a0 = W::add16(a0, W::mullo16(v0, t));
      a1 = W::add16(a1, W::mullo16(v1, t));
    }
    W::storei(out, W::srl16(a0, shift));
    W::storei(out + kHalf, W::srl16(a1, shift));
  }

  template <class Src, class Taps>
  int16_t one(const Src& src, int i, const Taps& t, int n) const {
    int32_t sum = 0;
    for (int k = 0; k < n; ++k) sum += t.scalar(k) * static_cast<int32_t>(src.at(k)[i]);
    return static_cast<int16_t>(sum >> shift);
  }
};

// ---- the span routine --------------------------------------------------------

// n outputs of a kernel of `count` taps; kKnown > 0 fixes the size at
// compile time and keeps the taps in registers.
template <int kKnown, class P, class Src, class RawTaps>
void filterSpan(const P& policyRef, const Src& src, typename P::Out* out, int n, const RawTaps& rawTaps,
                int count) {
  // A local copy: stores to `out` cannot change it, so its fields stay in
  // registers across the loop.
  const P policy = policyRef;
  const Bound<P, RawTaps> taps{rawTaps};
  int i = 0;
  if (kKnown > 0) {
    CachedTaps<P, (kKnown > 0 ? kKnown : 1)> cached;
    for (int k = 0; k < kKnown; ++k) {
      cached.v[k] = taps.vec(k);
      cached.s[k] = taps.scalar(k);
    }
    const auto fixed = src.template fixed<(kKnown > 0 ? kKnown : 1)>();
    for (; i + P::kBlock <= n; i += P::kBlock) policy.block(fixed, i, out + i, cached, kKnown);
    // The last partial block is computed again as a whole block ending at n:
    // each output depends only on its own inputs, so the overlap rewrites
    // the same values.
    if (i < n && n >= P::kBlock) policy.block(fixed, n - P::kBlock, out + n - P::kBlock, cached, kKnown);
    else
      for (; i < n; ++i) out[i] = policy.one(fixed, i, cached, kKnown);
  } else {
    for (; i + P::kBlock <= n; i += P::kBlock) policy.block(src, i, out + i, taps, count);
    if (i < n && n >= P::kBlock) policy.block(src, n - P::kBlock, out + n - P::kBlock, taps, count);
    else
      for (; i < n; ++i) out[i] = policy.one(src, i, taps, count);
  }
}

// The dedicated sizes 3 and 5, or the general path, with the policy `p`
// (given in its SSE2 form) run on instruction set Isa.
template <class Isa, class P, class Src, class Taps>
void spanWith(const P& p, const Src& src, typename P::Out* out, int n, const Taps& taps, int count) {
  if (n <= 0) return;
  const auto policy = p.template to<Isa>();
  if (count == 3)
    filterSpan<3>(policy, src, out, n, taps, count);
  else if (count == 5)
    filterSpan<5>(policy, src, out, n, taps, count);
  else
    filterSpan<0>(policy, src, out, n, taps, count);
}

// The policies the pipeline members run, in their SSE2 form.
using Row16s = FloatSum<int16_t, int16_t, false>;
using Row16u = FloatSum<uint16_t, uint16_t, false>;
using Row8u16s = FloatSum<uint8_t, int16_t, false>;
using RowPairs16s = PairSum<int16_t, int16_t, false>;
using RowPairs8u16s = PairSum<uint8_t, int16_t, false>;
using Col16s = FloatSum<int16_t, int16_t, true>;
using Col16s8s = FloatSum<int16_t, int8_t, true>;
using Col16s8u = FloatSum<int16_t, uint8_t, true>;
using Col16u = FloatSum<uint16_t, uint16_t, true>;
using ColPairs16s = PairSum<int16_t, int16_t, true>;
using ColPairs16s8s = PairSum<int16_t, int8_t, true>;
using ColPairs16s8u = PairSum<int16_t, uint8_t, true>;

// Every (policy, source, taps) the members use; X(Isa, P, Src, Taps).
#define ZELCV_SEP_SPANS(X, Isa)                                      \
  X(Isa, Row16s, RowSource<int16_t>, PreparedTaps<float>)           \
  X(Isa, Row16u, RowSource<uint16_t>, PreparedTaps<float>)          \
  X(Isa, Row8u16s, RowSource<uint8_t>, PreparedTaps<float>)         \
  X(Isa, LowSum<>, RowSource<int16_t>, PreparedTaps<int16_t>)        \
  X(Isa, ShortSum<>, RowSource<uint8_t>, PreparedTaps<int16_t>)      \
  X(Isa, ShiftSum<>, RowSource<uint8_t>, PreparedTaps<int16_t>)      \
  X(Isa, RowPairs16s, RowSource<int16_t>, ComputedTaps<int16_t>)     \
  X(Isa, RowPairs8u16s, RowSource<uint8_t>, ComputedTaps<int16_t>)   \
  X(Isa, DoubleSum, RowSource<float>, PreparedTaps<double>)         \
  X(Isa, Col16s, ColumnSource<int16_t>, ComputedTaps<int16_t>)       \
  X(Isa, Col16s8s, ColumnSource<int16_t>, ComputedTaps<int16_t>)     \
  X(Isa, Col16s8u, ColumnSource<int16_t>, ComputedTaps<int16_t>)     \
  X(Isa, Col16u, ColumnSource<uint16_t>, ComputedTaps<int16_t>)      \
  X(Isa, ColPairs16s, ColumnSource<int16_t>, ComputedTaps<int16_t>)  \
  X(Isa, ColPairs16s8s, ColumnSource<int16_t>, ComputedTaps<int16_t>) \
  X(Isa, ColPairs16s8u, ColumnSource<int16_t>, ComputedTaps<int16_t>) \
  X(Isa, LowSum<>, ColumnSource<int16_t>, ComputedTaps<int16_t>)     \
  X(Isa, SingleSum, ColumnSource<float>, ComputedTaps<float>)

// The 32f policies also have AVX-512 forms: their row pass sums in double,
// and twice the lanes per instruction is what brings it up to speed.
#define ZELCV_SEP_WIDEST_SPANS(X, Isa)                        \
  X(Isa, DoubleSum, RowSource<float>, PreparedTaps<double>) \
  X(Isa, SingleSum, ColumnSource<float>, ComputedTaps<float>)
template <class P> struct HasAvx512Form : std::false_type {};
template <typename Acc> struct HasAvx512Form<FloatDataSum<Acc>> : std::true_type {};

#define ZELCV_SEP_SPAN(Isa, P, Src, Taps) \
  void spanWith<Isa, P, Src, Taps>(const P&, const Src&, P::Out*, int, const Taps&, int);
#define ZELCV_SEP_EXTERN_SPAN(Isa, P, Src, Taps) extern template ZELCV_SEP_SPAN(Isa, P, Src, Taps)
// Built in sepfilter_avx2.cpp and sepfilter_avx512.cpp.
ZELCV_SEP_SPANS(ZELCV_SEP_EXTERN_SPAN, avx2::Isa)
ZELCV_SEP_WIDEST_SPANS(ZELCV_SEP_EXTERN_SPAN, avx512::Isa)

// The span routine on the instruction set chosen at load.
template <class P, class Src, class Taps>
void filterSpanAnySize(const P& policy, const Src& src, typename P::Out* out, int n, const Taps& taps, int count) {
  constexpr IsaLevel kWidest = HasAvx512Form<P>::value ? IsaLevel::Avx512 : IsaLevel::Avx2;
  withChosenIsa<kWidest>(
      [&](auto isa) { spanWith<typename decltype(isa)::Isa>(policy, src, out, n, taps, count); });
}

}  // namespace sep
}  // namespace zelcv

#endif  // ZELCV_FILTER_SEPFILTER_KERNELS_H
