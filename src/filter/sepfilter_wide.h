// The vector operations, sources, loads, stores and tap accessors that the
// separable pipeline's arithmetic policies (sepfilter_kernels.h) are written
// in. Wide<Isa> is given here for SSE2; sepfilter_avx2.cpp and
// sepfilter_avx512.cpp give the wider forms.
#ifndef ZELCV_FILTER_SEPFILTER_WIDE_H
#define ZELCV_FILTER_SEPFILTER_WIDE_H

#include <emmintrin.h>
#include <stdint.h>

#include "kernels/simd.h"

// The sources are not instruction-set specific but are used by the AVX2 and
// AVX-512 files too: an out-of-line copy compiled there would be a mergeable
// symbol that the linker may keep for the baseline code as well, so they are
// always inlined (the build checks the wide objects for such copies).
#define ZELCV_ALWAYS_INLINE inline __attribute__((always_inline))

namespace zelcv {
namespace sep {
// ---- sources -------------------------------------------------------------

template <typename S, int N> struct FixedRowSource;

// Row pass: tap k reads the row `stride` elements (one pixel) further on.
template <typename S>
struct RowSource {
  const S* base;
  int stride;
  ZELCV_ALWAYS_INLINE const S* at(int k) const { return base + k * stride; }
  template <int N> ZELCV_ALWAYS_INLINE FixedRowSource<S, N> fixed() const { return {{base, stride}}; }
};

// The same with N taps known at compile time, for policies that cut the
// windows of all taps from one pass over the row.
template <typename S, int N>
struct FixedRowSource : RowSource<S> {};

// Column pass with a kernel size known at compile time: the row pointers
// copied into locals, so that stores to the output cannot make the
// compiler reload them.
template <typename S, int N>
struct FixedColumnSource {
  const S* rows[N];
  ZELCV_ALWAYS_INLINE const S* at(int k) const { return rows[k]; }
};

// Column pass: tap k reads row pointer k.
template <typename S>
struct ColumnSource {
  const S* const* rows;
  ZELCV_ALWAYS_INLINE const S* at(int k) const { return rows[k]; }
  template <int N> ZELCV_ALWAYS_INLINE FixedColumnSource<S, N> fixed() const {
    FixedColumnSource<S, N> f;
    for (int k = 0; k < N; ++k) f.rows[k] = rows[k];
    return f;
  }
};

// ---- vector operations per instruction set ---------------------------------

// F: floats, D: doubles, I: integers; kFloats 32-bit lanes per vector.
// Integer sums come in "pair layout": two vectors a0, a1 of 32-bit lanes
// that packs32(a0, a1) turns into 16-bit lanes in element order, as the
// unpacklo/unpackhi of 16-bit lanes leave them (within each 128-bit half).
template <typename Isa> struct Wide;

template <> struct Wide<simd::Sse2> {
  using F = __m128;
  using D = __m128d;
  using I = __m128i;
  static constexpr int kFloats = 4;

  static F setf(float a) { return _mm_set1_ps(a); }
  static F addf(F a, F b) { return _mm_add_ps(a, b); }
  static F mulf(F a, F b) { return _mm_mul_ps(a, b); }
  static F minf(F a, F b) { return _mm_min_ps(a, b); }
  static F maxf(F a, F b) { return _mm_max_ps(a, b); }
  static I roundToInt(F a) { return _mm_cvtps_epi32(a); }
  static I truncToInt(F a) { return _mm_cvttps_epi32(a); }
  static F toFloat(I a) { return _mm_cvtepi32_ps(a); }
  static float firstf(F a) { return _mm_cvtss_f32(a); }
  static F loadf(const float* p) { return _mm_loadu_ps(p); }
  static void storef(float* p, F a) { _mm_storeu_ps(p, a); }

  static D setd(double a) { return _mm_set1_pd(a); }
  static D muld(D a, D b) { return _mm_mul_pd(a, b); }
  // acc + a x b where the product is exact in double (two floats widened).
  static D addExactProductd(D acc, D a, D b) { return _mm_add_pd(acc, _mm_mul_pd(a, b)); }
  static double firstd(D a) { return _mm_cvtsd_f64(a); }
  // Lanes r .. r + 1 of the concatenation lo:hi.
  template <int r> static D shiftd(D lo, D hi) {
    static_assert(r == 1, "lane 0 is lo itself");
    return _mm_shuffle_pd(lo, hi, 1);
  }
  // kFloats / 2 floats widened to doubles (an 8-byte load, one cvtps2pd).
  static D widen(const float* p) {
    return _mm_cvtps_pd(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p))));
  }
  // Two vectors of doubles rounded to kFloats floats.
  static void storeNarrowed(float* p, D a0, D a1) { _mm_storeu_ps(p, _mm_movelh_ps(_mm_cvtpd_ps(a0), _mm_cvtpd_ps(a1))); }

  static I zero() { return _mm_setzero_si128(); }
  static I set16(int a) { return _mm_set1_epi16(static_cast<short>(a)); }
  static I set32(int a) { return _mm_set1_epi32(a); }
  static I loadi(const void* p) { return _mm_loadu_si128(static_cast<const __m128i*>(p)); }
  static void storei(void* p, I a) { _mm_storeu_si128(static_cast<__m128i*>(p), a); }
  static I add16(I a, I b) { return _mm_add_epi16(a, b); }
  static I add32(I a, I b) { return _mm_add_epi32(a, b); }
  static I srl16(I a, int n) { return _mm_srl_epi16(a, _mm_cvtsi32_si128(n)); }
  static I mullo16(I a, I b) { return _mm_mullo_epi16(a, b); }
  static I mulhi16(I a, I b) { return _mm_mulhi_epi16(a, b); }
  static I madd16(I a, I b) { return _mm_madd_epi16(a, b); }
  static I lo16(I a, I b) { return _mm_unpacklo_epi16(a, b); }
  static I hi16(I a, I b) { return _mm_unpackhi_epi16(a, b); }
  static I bitAnd(I a, I b) { return _mm_and_si128(a, b); }
  static I bitOr(I a, I b) { return _mm_or_si128(a, b); }
  static I min32(I a, I b) { return simd::Vec<int32_t>::min(a, b); }
  static I max32(I a, I b) { return simd::Vec<int32_t>::max(a, b); }
  template <int n> static I srai32(I a) { return _mm_srai_epi32(a, n); }
  template <int n> static I slli32(I a) { return _mm_slli_epi32(a, n); }
  template <int n> static I srli32(I a) { return _mm_srli_epi32(a, n); }
  static I packs32(I a, I b) { return _mm_packs_epi32(a, b); }
  static int first16(I a) { return static_cast<int16_t>(_mm_cvtsi128_si32(a)); }

  // 2 kFloats bytes widened to 16-bit lanes in order.
  static I widenBytes(const uint8_t* p) {
    return _mm_unpacklo_epi8(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p)), _mm_setzero_si128());
  }
  // 4 kFloats bytes widened to two vectors of 16-bit lanes in order.
  static void widenBytes2(const uint8_t* p, I& a, I& b) {
    const I v = loadi(p);
    a = _mm_unpacklo_epi8(v, _mm_setzero_si128());
    b = _mm_unpackhi_epi8(v, _mm_setzero_si128());
  }

  // 16-bit lanes in element order, already inside the range, narrowed.
  static void storeBytes(uint8_t* p, I v) { _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packus_epi16(v, v)); }
  static void storeBytes(int8_t* p, I v) { _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packs_epi16(v, v)); }
  // Pair layout inside 0 .. 65535 to unsigned 16 bits. No unsigned 32->16
  // pack in SSE2: shift into the signed range and back.
  static void storeUnsigned(uint16_t* p, I a0, I a1) {
    const I bias = _mm_set1_epi32(32768);
    I v = _mm_packs_epi32(_mm_sub_epi32(a0, bias), _mm_sub_epi32(a1, bias));
    storei(p, _mm_xor_si128(v, _mm_set1_epi16(static_cast<short>(0x8000))));
  }

  // A tap prepared as a 16-byte vector (every lane the same), as a vector.
  static F tapf(const __m128* p) { return *p; }
  static D tapd(const __m128d* p) { return *p; }
  static I tap16(const __m128i* p) { return *p; }
  static I tap32(const __m128i* p) { return *p; }
};

// ---- loads and stores ------------------------------------------------------

// kFloats * 2 elements converted to floats in pair layout.
template <class W> void toFloats(const uint8_t* p, typename W::F& a, typename W::F& b) {
  const typename W::I w = W::widenBytes(p);
  a = W::toFloat(W::lo16(w, W::zero()));
  b = W::toFloat(W::hi16(w, W::zero()));
}
template <class W> void toFloats(const int16_t* p, typename W::F& a, typename W::F& b) {
  const typename W::I v = W::loadi(p);
  a = W::toFloat(W::template srai32<16>(W::lo16(v, v)));
  b = W::toFloat(W::template srai32<16>(W::hi16(v, v)));
}
template <class W> void toFloats(const uint16_t* p, typename W::F& a, typename W::F& b) {
  const typename W::I v = W::loadi(p);
  a = W::toFloat(W::lo16(v, W::zero()));
  b = W::toFloat(W::hi16(v, W::zero()));
}

// kFloats * 2 elements as 16-bit lanes in order (8-bit data is unsigned).
template <class W> typename W::I to16(const uint8_t* p) { return W::widenBytes(p); }
template <class W> typename W::I to16(const int16_t* p) { return W::loadi(p); }

// Stores kFloats * 2 values in pair layout that are already inside the
// range of the element type.
template <class W> void storePair(int16_t* p, typename W::I a0, typename W::I a1) { W::storei(p, W::packs32(a0, a1)); }
template <class W> void storePair(uint16_t* p, typename W::I a0, typename W::I a1) { W::storeUnsigned(p, a0, a1); }
template <class W> void storePair(uint8_t* p, typename W::I a0, typename W::I a1) {
  W::storeBytes(p, W::packs32(a0, a1));
}
template <class W> void storePair(int8_t* p, typename W::I a0, typename W::I a1) {
  W::storeBytes(p, W::packs32(a0, a1));
}

template <typename D> struct Range;
template <> struct Range<uint8_t> { static constexpr float lo = 0.0f, hi = 255.0f; };
template <> struct Range<int8_t> { static constexpr float lo = -128.0f, hi = 127.0f; };
template <> struct Range<uint16_t> { static constexpr float lo = 0.0f, hi = 65535.0f; };
template <> struct Range<int16_t> { static constexpr float lo = -32768.0f, hi = 32767.0f; };

// The clamp of the vector path written for one value: max then min, each
// keeping its second operand when the first is NaN (a zero divisor of a
// member that does not refuse one), exactly as maxps and minps do.
static inline float clampLikeVector(float v, float lo, float hi) {
  v = v > lo ? v : lo;
  return v < hi ? v : hi;
}

// ---- taps ------------------------------------------------------------------

// Taps reach the policies through an accessor: vec(k) is tap k broadcast to
// a vector of the policy, scalar(k) the same value for the scalar tail.
// The accessors below serve every policy and instruction set; Bound ties
// one to a policy.
// The 16-byte vector that holds a prepared tap of type T.
template <typename T> struct PreparedVec;
template <> struct PreparedVec<float> { using type = __m128; };
template <> struct PreparedVec<double> { using type = __m128d; };
template <> struct PreparedVec<int16_t> { using type = __m128i; };

template <typename T>
struct PreparedTaps {  // 16-byte vectors built once per call (row pass buffer)
  const typename PreparedVec<T>::type* v;
  template <class P> typename P::V vec(int k) const { return P::Tap::prepared(v + k); }
  template <class P> typename P::A scalar(int k) const { return P::Tap::lane0(vec<P>(k)); }
};

template <typename T>
struct ComputedTaps {  // formed from the caller's kernel where they are used
  const T* kernel;
  float scale;
  template <class P> typename P::A scalar(int k) const { return P::Tap::make(kernel[k], scale); }
  template <class P> typename P::V vec(int k) const { return P::Tap::broadcast(scalar<P>(k)); }
};

template <class P, class Taps>
struct Bound {
  const Taps& taps;
  typename P::V vec(int k) const { return taps.template vec<P>(k); }
  typename P::A scalar(int k) const { return taps.template scalar<P>(k); }
};

template <class P, int N>
struct CachedTaps {  // a size fixed at compile time, held in registers
  typename P::V v[N];
  typename P::A s[N];
  typename P::V vec(int k) const { return v[k]; }
  typename P::A scalar(int k) const { return s[k]; }
};

}  // namespace sep
}  // namespace zelcv

#endif  // ZELCV_FILTER_SEPFILTER_WIDE_H
