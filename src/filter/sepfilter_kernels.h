// Inner loops of the separable pipeline. One span routine computes
//   out[i] = convert(sum_k tap[k] * source(k)[i]),  i = 0 .. n-1,
// where source(k) is the row shifted by k pixels (row pass) or the k-th row
// pointer (column pass). An arithmetic policy says how a sum is formed and
// converted; the vector block and the scalar tail of each policy add the
// same products in the same order (tap 0 first, no leading zero), so every
// path, every alignment and both x86 targets give the same bits.
#ifndef ZELCV_FILTER_SEPFILTER_KERNELS_H
#define ZELCV_FILTER_SEPFILTER_KERNELS_H

#include <emmintrin.h>
#include <stdint.h>

#include "kernels/simd.h"

namespace zelcv {
namespace sep {

// ---- sources -------------------------------------------------------------

// Row pass: tap k reads the row `stride` elements (one pixel) further on.
template <typename S>
struct RowSource {
  const S* base;
  int stride;
  const S* at(int k) const { return base + k * stride; }
  template <int N> RowSource fixed() const { return *this; }
};

// Column pass with a kernel size known at compile time: the row pointers
// copied into locals, so that stores to the output cannot make the
// compiler reload them.
template <typename S, int N>
struct FixedColumnSource {
  const S* rows[N];
  const S* at(int k) const { return rows[k]; }
};

// Column pass: tap k reads row pointer k.
template <typename S>
struct ColumnSource {
  const S* const* rows;
  const S* at(int k) const { return rows[k]; }
  template <int N> FixedColumnSource<S, N> fixed() const {
    FixedColumnSource<S, N> f;
    for (int k = 0; k < N; ++k) f.rows[k] = rows[k];
    return f;
  }
};

// ---- loads and stores ------------------------------------------------------

inline void load8(const uint8_t* p, __m128& a, __m128& b) {
  const __m128i zero = _mm_setzero_si128();
  __m128i w = _mm_unpacklo_epi8(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)), zero);
  a = _mm_cvtepi32_ps(_mm_unpacklo_epi16(w, zero));
  b = _mm_cvtepi32_ps(_mm_unpackhi_epi16(w, zero));
}
inline void load8(const int16_t* p, __m128& a, __m128& b) {
  __m128i v = simd::Vec<int16_t>::loadu(p);
  a = _mm_cvtepi32_ps(_mm_srai_epi32(_mm_unpacklo_epi16(v, v), 16));
  b = _mm_cvtepi32_ps(_mm_srai_epi32(_mm_unpackhi_epi16(v, v), 16));
}
inline void load8(const uint16_t* p, __m128& a, __m128& b) {
  const __m128i zero = _mm_setzero_si128();
  __m128i v = simd::Vec<uint16_t>::loadu(p);
  a = _mm_cvtepi32_ps(_mm_unpacklo_epi16(v, zero));
  b = _mm_cvtepi32_ps(_mm_unpackhi_epi16(v, zero));
}

// Stores 8 values that are already inside the range of the element type.
inline void store8(int16_t* p, __m128i a, __m128i b) {
  simd::Vec<int16_t>::storeu(p, _mm_packs_epi32(a, b));
}
inline void store8(uint16_t* p, __m128i a, __m128i b) {
  // No unsigned 32->16 pack in SSE2: shift into the signed range and back.
  const __m128i bias = _mm_set1_epi32(32768);
  __m128i v = _mm_packs_epi32(_mm_sub_epi32(a, bias), _mm_sub_epi32(b, bias));
  simd::Vec<uint16_t>::storeu(p, _mm_xor_si128(v, _mm_set1_epi16(static_cast<short>(0x8000))));
}
inline void store8(uint8_t* p, __m128i a, __m128i b) {
  __m128i v = _mm_packs_epi32(a, b);
  _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packus_epi16(v, v));
}
inline void store8(int8_t* p, __m128i a, __m128i b) {
  __m128i v = _mm_packs_epi32(a, b);
  _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packs_epi16(v, v));
}

template <typename D> struct Range;
template <> struct Range<uint8_t> { static constexpr float lo = 0.0f, hi = 255.0f; };
template <> struct Range<int8_t> { static constexpr float lo = -128.0f, hi = 127.0f; };
template <> struct Range<uint16_t> { static constexpr float lo = 0.0f, hi = 65535.0f; };
template <> struct Range<int16_t> { static constexpr float lo = -32768.0f, hi = 32767.0f; };

// The clamp of the vector path written for one value: max then min, each
// keeping its second operand when the first is NaN (a zero divisor of a
// member that does not refuse one), exactly as maxps and minps do.
inline float clampLikeVector(float v, float lo, float hi) {
  v = v > lo ? v : lo;
  return v < hi ? v : hi;
}

// ---- taps ------------------------------------------------------------------

// Taps reach the policies through an accessor: vec(k) is tap k broadcast to
// a vector, scalar(k) the same value for the scalar tail.
template <class P>
struct PreparedTaps {  // broadcast vectors built once per call (row pass buffer)
  const typename P::V* v;
  typename P::V vec(int k) const { return v[k]; }
  typename P::A scalar(int k) const { return P::Tap::lane0(v[k]); }
};

template <class P, typename T>
struct ComputedTaps {  // formed from the caller's kernel where they are used
  const T* kernel;
  float scale;
  typename P::A scalar(int k) const { return P::Tap::make(kernel[k], scale); }
  typename P::V vec(int k) const { return P::Tap::broadcast(scalar(k)); }
};

template <class P, int N>
struct CachedTaps {  // a size fixed at compile time, held in registers
  typename P::V v[N];
  typename P::A s[N];
  typename P::V vec(int k) const { return v[k]; }
  typename P::A scalar(int k) const { return s[k]; }
};

// ---- arithmetic policies ---------------------------------------------------

// Integer data, single-precision taps (already scaled by 1/divisor), single
// precision sum, clamp, then truncation (row pass) or rounding to nearest
// even (column pass).
template <typename S, typename D, bool kRound>
struct FloatSum {
  using Source = S;
  using Out = D;
  using V = __m128;
  using A = float;
  static constexpr int kBlock = 8;
  struct Tap {  // one tap of the call, from the integer kernel
    template <typename T> static A make(T tap, float scale) { return static_cast<float>(tap) * scale; }
    static V broadcast(A a) { return _mm_set1_ps(a); }
    static A lane0(V v) { return _mm_cvtss_f32(v); }
  };

  template <class Src, class Taps>
  static void block(const Src& src, int i, D* out, const Taps& taps, int n) {
    __m128 a0, a1, p0, p1;
    load8(src.at(0) + i, p0, p1);
    a0 = _mm_mul_ps(taps.vec(0), p0);
    a1 = _mm_mul_ps(taps.vec(0), p1);
    for (int k = 1; k < n; ++k) {
      load8(src.at(k) + i, p0, p1);
      a0 = _mm_add_ps(a0, _mm_mul_ps(taps.vec(k), p0));
      a1 = _mm_add_ps(a1, _mm_mul_ps(taps.vec(k), p1));
    }
    const __m128 lo = _mm_set1_ps(Range<D>::lo), hi = _mm_set1_ps(Range<D>::hi);
    a0 = _mm_min_ps(_mm_max_ps(a0, lo), hi);
    a1 = _mm_min_ps(_mm_max_ps(a1, lo), hi);
    if (kRound)
      store8(out, _mm_cvtps_epi32(a0), _mm_cvtps_epi32(a1));
    else
      store8(out, _mm_cvttps_epi32(a0), _mm_cvttps_epi32(a1));
  }

  template <class Src, class Taps>
  static D one(const Src& src, int i, const Taps& t, int n) {
    float acc = t.scalar(0) * static_cast<float>(src.at(0)[i]);
    for (int k = 1; k < n; ++k) acc += t.scalar(k) * static_cast<float>(src.at(k)[i]);
    acc = clampLikeVector(acc, Range<D>::lo, Range<D>::hi);
    return static_cast<D>(kRound ? _mm_cvtss_si32(_mm_set_ss(acc)) : _mm_cvttss_si32(_mm_set_ss(acc)));
  }
};

// Two floats widened to doubles (an unaligned 8-byte load, one cvtps2pd).
inline __m128d widen2(const float* p) {
  return _mm_cvtps_pd(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p))));
}

// Vector lanes of the accumulator type of the 32f members.
template <typename Acc> struct Lanes;
template <> struct Lanes<double> {
  using V = __m128d;
  static constexpr int kCount = 2;
  static V load(const float* p) { return widen2(p); }
  static V mul(V a, V b) { return _mm_mul_pd(a, b); }
  static V add(V a, V b) { return _mm_add_pd(a, b); }
  static V set1(double a) { return _mm_set1_pd(a); }
  static double lane0(V v) { return _mm_cvtsd_f64(v); }
  static void store(float* out, V a0, V a1) { _mm_storeu_ps(out, _mm_movelh_ps(_mm_cvtpd_ps(a0), _mm_cvtpd_ps(a1))); }
};
template <> struct Lanes<float> {
  using V = __m128;
  static constexpr int kCount = 4;
  static V load(const float* p) { return _mm_loadu_ps(p); }
  static V mul(V a, V b) { return _mm_mul_ps(a, b); }
  static V add(V a, V b) { return _mm_add_ps(a, b); }
  static V set1(float a) { return _mm_set1_ps(a); }
  static float lane0(V v) { return _mm_cvtss_f32(v); }
  static void store(float* out, V a0, V a1) {
    _mm_storeu_ps(out, a0);
    _mm_storeu_ps(out + 4, a1);
  }
};

// 32f members: no divisor; products and sum in `Acc` (double for the row
// pass, one rounding to float at the end; float for the column pass). A
// block is two vectors, which keeps the double accumulators, the taps and
// the temporaries in registers.
template <typename Acc>
struct FloatDataSum {
  using L = Lanes<Acc>;
  using Source = float;
  using Out = float;
  using V = typename L::V;
  using A = Acc;
  static constexpr int kBlock = 2 * L::kCount;
  struct Tap {
    static A make(float tap, float) { return tap; }
    static V broadcast(A a) { return L::set1(a); }
    static A lane0(V v) { return L::lane0(v); }
  };

  template <class Src, class Taps>
  static void block(const Src& src, int i, float* out, const Taps& taps, int n) {
    const float* p = src.at(0) + i;
    V a0 = L::mul(taps.vec(0), L::load(p)), a1 = L::mul(taps.vec(0), L::load(p + L::kCount));
    for (int k = 1; k < n; ++k) {
      p = src.at(k) + i;
      a0 = L::add(a0, L::mul(taps.vec(k), L::load(p)));
      a1 = L::add(a1, L::mul(taps.vec(k), L::load(p + L::kCount)));
    }
    L::store(out, a0, a1);
  }

  template <class Src, class Taps>
  static float one(const Src& src, int i, const Taps& t, int n) {
    Acc acc = t.scalar(0) * static_cast<Acc>(src.at(0)[i]);
    for (int k = 1; k < n; ++k) acc += t.scalar(k) * static_cast<Acc>(src.at(k)[i]);
    return static_cast<float>(acc);
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
    if (!s.unit) s.r = static_cast<int16_t>(static_cast<int>(16384.0f / static_cast<float>(divisor)));
    return s;
  }
  // floor(sum * r / 2^14) saturated to 16 bits, the product taken exactly.
  int16_t apply(int32_t sum) const {
    int64_t v = unit ? sum : (static_cast<int64_t>(sum) * r) >> 14;
    return static_cast<int16_t>(v < -32768 ? -32768 : v > 32767 ? 32767 : v);
  }
  // The same for four sums. The sum is split as hi * 2^16 + lo (lo unsigned)
  // so that pmaddwd forms hi * r and lo * r exactly; then
  // floor(sum * r / 2^14) = 4 * hi * r + floor(lo * r / 2^14). hi * r is
  // clamped to +-2^15 first, which cannot move a result across the 16-bit
  // saturation limits but keeps 4 * hi * r inside 32 bits. 2r fits 16 bits
  // because r = 16384 only arises from divisor 1, which skips r.
  __m128i apply4(__m128i sum) const {
    if (unit) return sum;
    const __m128i hiMul = _mm_set1_epi32(static_cast<int>(static_cast<uint32_t>(static_cast<uint16_t>(r)) << 16));
    const __m128i loMul = _mm_set1_epi32(static_cast<int>(static_cast<uint16_t>(2 * r) |
                                                          (static_cast<uint32_t>(static_cast<uint16_t>(r)) << 16)));
    __m128i hr = _mm_madd_epi16(sum, hiMul);
    __m128i loHalf = _mm_srli_epi32(_mm_slli_epi32(sum, 16), 17);
    __m128i loBit = _mm_slli_epi32(_mm_and_si128(sum, _mm_set1_epi32(1)), 16);
    __m128i lr = _mm_madd_epi16(_mm_or_si128(loHalf, loBit), loMul);
    hr = simd::Vec<int32_t>::max(simd::Vec<int32_t>::min(hr, _mm_set1_epi32(32768)), _mm_set1_epi32(-32768));
    return _mm_add_epi32(_mm_slli_epi32(hr, 2), _mm_srai_epi32(lr, 14));
  }
};

// _Low 16s: integer products summed in 32 bits (wrapping), then LowScale.
struct LowSum {
  using Source = int16_t;
  using Out = int16_t;
  using V = __m128i;
  using A = int;
  static constexpr int kBlock = 8;
  struct Tap {
    static A make(int16_t tap, float) { return tap; }
    static V broadcast(A a) { return _mm_set1_epi16(static_cast<short>(a)); }
    static A lane0(V v) { return static_cast<int16_t>(_mm_cvtsi128_si32(v)); }
  };
  LowScale scale;

  template <class Src, class Taps>
  void block(const Src& src, int i, int16_t* out, const Taps& taps, int n) const {
    __m128i a0 = _mm_setzero_si128(), a1 = _mm_setzero_si128();
    for (int k = 0; k < n; ++k) {
      __m128i v = simd::Vec<int16_t>::loadu(src.at(k) + i);
      const __m128i t = taps.vec(k);
      __m128i lo = _mm_mullo_epi16(v, t), hi = _mm_mulhi_epi16(v, t);
      a0 = _mm_add_epi32(a0, _mm_unpacklo_epi16(lo, hi));
      a1 = _mm_add_epi32(a1, _mm_unpackhi_epi16(lo, hi));
    }
    simd::Vec<int16_t>::storeu(out, _mm_packs_epi32(scale.apply4(a0), scale.apply4(a1)));
  }

  template <class Src, class Taps>
  int16_t one(const Src& src, int i, const Taps& t, int n) const {
    uint32_t acc = 0;  // wraps like the vector lanes
    for (int k = 0; k < n; ++k) acc += static_cast<uint32_t>(t.scalar(k) * src.at(k)[i]);
    return scale.apply(static_cast<int32_t>(acc));
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

// Eight elements widened to 16-bit lanes (8-bit data is unsigned).
inline __m128i load8x16(const uint8_t* p) {
  return _mm_unpacklo_epi8(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)), _mm_setzero_si128());
}
inline __m128i load8x16(const int16_t* p) { return simd::Vec<int16_t>::loadu(p); }

// Integer taps for the exact policies (the accessor of their scalar tail).
struct IntegerTap {
  static int make(int16_t tap, float) { return tap; }
  static __m128i broadcast(int a) { return _mm_set1_epi16(static_cast<short>(a)); }
  static int lane0(__m128i v) { return static_cast<int16_t>(_mm_cvtsi128_si32(v)); }
};

// Converts exact integer sums to the output as FloatSum would.
template <typename D, bool kRound>
inline D convertExact(int32_t sum, float scale) {
  float v = clampLikeVector(static_cast<float>(sum) * scale, Range<D>::lo, Range<D>::hi);
  return static_cast<D>(kRound ? _mm_cvtss_si32(_mm_set_ss(v)) : _mm_cvttss_si32(_mm_set_ss(v)));
}
// |sum| < 2^24, so sum x scale converts without overflow, and since the
// clamp limits are integers, clamping before the conversion equals the
// saturation of the packing stores after it.
template <typename D, bool kRound>
inline void storeExact(D* out, __m128i a0, __m128i a1, float scale) {
  const __m128 f = _mm_set1_ps(scale);
  __m128 v0 = _mm_mul_ps(_mm_cvtepi32_ps(a0), f);
  __m128 v1 = _mm_mul_ps(_mm_cvtepi32_ps(a1), f);
  if (kRound)
    store8(out, _mm_cvtps_epi32(v0), _mm_cvtps_epi32(v1));
  else
    store8(out, _mm_cvttps_epi32(v0), _mm_cvttps_epi32(v1));
}

// 32-bit sums from pmaddwd over pairs of taps: `pairs[j]` holds taps 2j and
// 2j+1 in every 32-bit lane (the odd last tap pairs with 0).
template <typename S, typename D, bool kRound>
struct PairSum {
  using Source = S;
  using Out = D;
  using V = __m128i;
  using A = int;
  using Tap = IntegerTap;
  static constexpr int kBlock = 8;
  const __m128i* pairs;
  float scale;

  static void preparePairs(const int16_t* kernel, int count, __m128i* pairs) {
    for (int k = 0; k < count; k += 2) {
      uint32_t lo = static_cast<uint16_t>(kernel[k]);
      uint32_t hi = k + 1 < count ? static_cast<uint16_t>(kernel[k + 1]) : 0u;
      pairs[k / 2] = _mm_set1_epi32(static_cast<int>(lo | (hi << 16)));
    }
  }

  template <class Src, class Taps>
  void block(const Src& src, int i, D* out, const Taps&, int n) const {
    __m128i a0 = _mm_setzero_si128(), a1 = _mm_setzero_si128();
    int k = 0;
    for (; k + 1 < n; k += 2) {
      __m128i p = load8x16(src.at(k) + i), q = load8x16(src.at(k + 1) + i);
      a0 = _mm_add_epi32(a0, _mm_madd_epi16(_mm_unpacklo_epi16(p, q), pairs[k / 2]));
      a1 = _mm_add_epi32(a1, _mm_madd_epi16(_mm_unpackhi_epi16(p, q), pairs[k / 2]));
    }
    if (k < n) {
      const __m128i zero = _mm_setzero_si128();
      __m128i p = load8x16(src.at(k) + i);
      a0 = _mm_add_epi32(a0, _mm_madd_epi16(_mm_unpacklo_epi16(p, zero), pairs[k / 2]));
      a1 = _mm_add_epi32(a1, _mm_madd_epi16(_mm_unpackhi_epi16(p, zero), pairs[k / 2]));
    }
    storeExact<D, kRound>(out, a0, a1, scale);
  }

  template <class Src, class Taps>
  D one(const Src& src, int i, const Taps& t, int n) const {
    int32_t sum = 0;
    for (int k = 0; k < n; ++k) sum += t.scalar(k) * static_cast<int32_t>(src.at(k)[i]);
    return convertExact<D, kRound>(sum, scale);
  }
};

// 8-bit rows into 16-bit results with 16-bit sums, for taps small enough
// that sum|tap| x 255 fits 15 bits (then no product or sum can wrap).
struct ShortSum {
  using Source = uint8_t;
  using Out = int16_t;
  using V = __m128i;
  using A = int;
  using Tap = IntegerTap;
  static constexpr int kBlock = 16;
  float scale;
  bool unit;  // divisor 1: the sum is the result

  template <class Src, class Taps>
  void block(const Src& src, int i, int16_t* out, const Taps& taps, int n) const {
    const __m128i zero = _mm_setzero_si128();
    __m128i a0 = zero, a1 = zero;
    for (int k = 0; k < n; ++k) {
      __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(src.at(k) + i));
      const __m128i t = taps.vec(k);
      a0 = _mm_add_epi16(a0, _mm_mullo_epi16(_mm_unpacklo_epi8(v, zero), t));
      a1 = _mm_add_epi16(a1, _mm_mullo_epi16(_mm_unpackhi_epi8(v, zero), t));
    }
    if (unit) {
      simd::Vec<int16_t>::storeu(out, a0);
      simd::Vec<int16_t>::storeu(out + 8, a1);
      return;
    }
    storeExact<int16_t, false>(out, _mm_srai_epi32(_mm_unpacklo_epi16(a0, a0), 16),
                               _mm_srai_epi32(_mm_unpackhi_epi16(a0, a0), 16), scale);
    storeExact<int16_t, false>(out + 8, _mm_srai_epi32(_mm_unpacklo_epi16(a1, a1), 16),
                               _mm_srai_epi32(_mm_unpackhi_epi16(a1, a1), 16), scale);
  }

  template <class Src, class Taps>
  int16_t one(const Src& src, int i, const Taps& t, int n) const {
    int32_t sum = 0;
    for (int k = 0; k < n; ++k) sum += t.scalar(k) * static_cast<int32_t>(src.at(k)[i]);
    return convertExact<int16_t, false>(sum, scale);
  }
};

// ---- the span routine --------------------------------------------------------

// n outputs of a kernel of `taps` taps; kKnown > 0 fixes the size at compile
// time and keeps the taps in registers.
template <int kKnown, class P, class Src, class Taps>
void filterSpan(const P& policyRef, const Src& src, typename P::Out* out, int n, const Taps& taps, int count) {
  // A local copy: stores to `out` cannot change it, so its fields stay in
  // registers across the loop.
  const P policy = policyRef;
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

// The dedicated sizes 3 and 5, or the general path.
template <class P, class Src, class Taps>
void filterSpanAnySize(const P& policy, const Src& src, typename P::Out* out, int n, const Taps& taps,
                       int count) {
  if (n <= 0) return;
  if (count == 3)
    filterSpan<3>(policy, src, out, n, taps, count);
  else if (count == 5)
    filterSpan<5>(policy, src, out, n, taps, count);
  else
    filterSpan<0>(policy, src, out, n, taps, count);
}

}  // namespace sep
}  // namespace zelcv

#endif  // ZELCV_FILTER_SEPFILTER_KERNELS_H
