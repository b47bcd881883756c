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
};

// Column pass: tap k reads row pointer k.
template <typename S>
struct ColumnSource {
  const S* const* rows;
  int offset;
  const S* at(int k) const { return rows[k] + offset; }
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

// 32f row pass: products and sum in double precision, one rounding to float.
struct DoubleSum {
  using Source = float;
  using Out = float;
  using V = __m128d;
  using A = double;
  static constexpr int kBlock = 8;
  struct Tap {
    static A make(float tap, float) { return tap; }
    static V broadcast(A a) { return _mm_set1_pd(a); }
    static A lane0(V v) { return _mm_cvtsd_f64(v); }
  };

  template <class Src, class Taps>
  static void block(const Src& src, int i, float* out, const Taps& taps, int n) {
    __m128d a[4];
    for (int k = 0; k < n; ++k) {
      const float* p = src.at(k) + i;
      __m128 lo = _mm_loadu_ps(p), hi = _mm_loadu_ps(p + 4);
      __m128d d[4] = {_mm_cvtps_pd(lo), _mm_cvtps_pd(_mm_movehl_ps(lo, lo)), _mm_cvtps_pd(hi),
                      _mm_cvtps_pd(_mm_movehl_ps(hi, hi))};
      const __m128d t = taps.vec(k);
      for (int j = 0; j < 4; ++j) a[j] = k == 0 ? _mm_mul_pd(t, d[j]) : _mm_add_pd(a[j], _mm_mul_pd(t, d[j]));
    }
    _mm_storeu_ps(out, _mm_movelh_ps(_mm_cvtpd_ps(a[0]), _mm_cvtpd_ps(a[1])));
    _mm_storeu_ps(out + 4, _mm_movelh_ps(_mm_cvtpd_ps(a[2]), _mm_cvtpd_ps(a[3])));
  }

  template <class Src, class Taps>
  static float one(const Src& src, int i, const Taps& t, int n) {
    double acc = t.scalar(0) * static_cast<double>(src.at(0)[i]);
    for (int k = 1; k < n; ++k) acc += t.scalar(k) * static_cast<double>(src.at(k)[i]);
    return static_cast<float>(acc);
  }
};

// 32f column pass: single precision throughout.
struct SingleSum {
  using Source = float;
  using Out = float;
  using V = __m128;
  using A = float;
  static constexpr int kBlock = 8;
  struct Tap {
    static A make(float tap, float) { return tap; }
    static V broadcast(A a) { return _mm_set1_ps(a); }
    static A lane0(V v) { return _mm_cvtss_f32(v); }
  };

  template <class Src, class Taps>
  static void block(const Src& src, int i, float* out, const Taps& taps, int n) {
    const float* p = src.at(0) + i;
    __m128 a0 = _mm_mul_ps(taps.vec(0), _mm_loadu_ps(p));
    __m128 a1 = _mm_mul_ps(taps.vec(0), _mm_loadu_ps(p + 4));
    for (int k = 1; k < n; ++k) {
      p = src.at(k) + i;
      a0 = _mm_add_ps(a0, _mm_mul_ps(taps.vec(k), _mm_loadu_ps(p)));
      a1 = _mm_add_ps(a1, _mm_mul_ps(taps.vec(k), _mm_loadu_ps(p + 4)));
    }
    _mm_storeu_ps(out, a0);
    _mm_storeu_ps(out + 4, a1);
  }

  template <class Src, class Taps>
  static float one(const Src& src, int i, const Taps& t, int n) {
    float acc = t.scalar(0) * src.at(0)[i];
    for (int k = 1; k < n; ++k) acc += t.scalar(k) * src.at(k)[i];
    return acc;
  }
};

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

// ---- the span routine --------------------------------------------------------

// n outputs of a kernel of `taps` taps; kKnown > 0 fixes the size at compile
// time and keeps the taps in registers.
template <int kKnown, class P, class Src, class Taps>
void filterSpan(const P& policy, const Src& src, typename P::Out* out, int n, const Taps& taps, int count) {
  int i = 0;
  if (kKnown > 0) {
    CachedTaps<P, (kKnown > 0 ? kKnown : 1)> cached;
    for (int k = 0; k < kKnown; ++k) {
      cached.v[k] = taps.vec(k);
      cached.s[k] = taps.scalar(k);
    }
    for (; i + P::kBlock <= n; i += P::kBlock) policy.block(src, i, out + i, cached, kKnown);
    for (; i < n; ++i) out[i] = policy.one(src, i, cached, kKnown);
  } else {
    for (; i + P::kBlock <= n; i += P::kBlock) policy.block(src, i, out + i, taps, count);
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
