// The AVX2 instances of the separable pipeline's span routines: the 256-bit
// forms of the vector operations the policies use, lane for lane the same
// arithmetic as the SSE2 forms.
#include "filter/sepfilter_kernels.h"
#include "kernels/simd_avx2.h"

namespace zelcv {
namespace sep {

template <> struct Wide<avx2::Isa> {
  using F = __m256;
  using D = __m256d;
  using I = __m256i;
  static constexpr int kFloats = 8;

  static F setf(float a) { return _mm256_set1_ps(a); }
  static F addf(F a, F b) { return _mm256_add_ps(a, b); }
  static F mulf(F a, F b) { return _mm256_mul_ps(a, b); }
  static F minf(F a, F b) { return _mm256_min_ps(a, b); }
  static F maxf(F a, F b) { return _mm256_max_ps(a, b); }
  static I roundToInt(F a) { return _mm256_cvtps_epi32(a); }
  static I truncToInt(F a) { return _mm256_cvttps_epi32(a); }
  static F toFloat(I a) { return _mm256_cvtepi32_ps(a); }
  static float firstf(F a) { return _mm256_cvtss_f32(a); }
  static F loadf(const float* p) { return _mm256_loadu_ps(p); }
  static void storef(float* p, F a) { _mm256_storeu_ps(p, a); }

  static D setd(double a) { return _mm256_set1_pd(a); }
  static D muld(D a, D b) { return _mm256_mul_pd(a, b); }
  // The product of two floats is exact in double, so the fused form rounds
  // once where the separate product and sum round once too: the same bits.
  static D addExactProductd(D acc, D a, D b) { return _mm256_fmadd_pd(a, b, acc); }
  static double firstd(D a) { return _mm256_cvtsd_f64(a); }
  // Lanes r .. r + 3 of the concatenation lo:hi, from the middle two
  // 128-bit halves and per-half picks.
  template <int r> static D shiftd(D lo, D hi) {
    static_assert(r >= 1 && r <= 3, "lane 0 is lo itself");
    const D mid = _mm256_permute2f128_pd(lo, hi, 0x21);
    if constexpr (r == 1)
      return _mm256_shuffle_pd(lo, mid, 5);
    else if constexpr (r == 2)
      return mid;
    else
      return _mm256_shuffle_pd(mid, hi, 5);
  }
  static D widen(const float* p) { return _mm256_cvtps_pd(_mm_loadu_ps(p)); }
  static void storeNarrowed(float* p, D a0, D a1) {
    _mm256_storeu_ps(p, _mm256_insertf128_ps(_mm256_castps128_ps256(_mm256_cvtpd_ps(a0)), _mm256_cvtpd_ps(a1), 1));
  }

  static I zero() { return _mm256_setzero_si256(); }
  static I set16(int a) { return _mm256_set1_epi16(static_cast<short>(a)); }
  static I set32(int a) { return _mm256_set1_epi32(a); }
  static I loadi(const void* p) { return _mm256_loadu_si256(static_cast<const __m256i*>(p)); }
  static void storei(void* p, I a) { _mm256_storeu_si256(static_cast<__m256i*>(p), a); }
  static I add16(I a, I b) { return _mm256_add_epi16(a, b); }
  static I add32(I a, I b) { return _mm256_add_epi32(a, b); }
  static I srl16(I a, int n) { return _mm256_srl_epi16(a, _mm_cvtsi32_si128(n)); }
  static I mullo16(I a, I b) { return _mm256_mullo_epi16(a, b); }
  static I mulhi16(I a, I b) { return _mm256_mulhi_epi16(a, b); }
  static I madd16(I a, I b) { return _mm256_madd_epi16(a, b); }
  static I lo16(I a, I b) { return _mm256_unpacklo_epi16(a, b); }
  static I hi16(I a, I b) { return _mm256_unpackhi_epi16(a, b); }
  static I bitAnd(I a, I b) { return _mm256_and_si256(a, b); }
  static I bitOr(I a, I b) { return _mm256_or_si256(a, b); }
  static I min32(I a, I b) { return _mm256_min_epi32(a, b); }
  static I max32(I a, I b) { return _mm256_max_epi32(a, b); }
  template <int n> static I srai32(I a) { return _mm256_srai_epi32(a, n); }
  template <int n> static I slli32(I a) { return _mm256_slli_epi32(a, n); }
  template <int n> static I srli32(I a) { return _mm256_srli_epi32(a, n); }
  static I packs32(I a, I b) { return _mm256_packs_epi32(a, b); }
  static int first16(I a) { return static_cast<int16_t>(_mm256_cvtsi256_si32(a)); }

  // The widening conversions cross the 128-bit halves, so the 16-bit lanes
  // come out in element order as in the SSE2 form.
  static I widenBytes(const uint8_t* p) {
    return _mm256_cvtepu8_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p)));
  }
  static void widenBytes2(const uint8_t* p, I& a, I& b) {
    a = widenBytes(p);
    b = widenBytes(p + 16);
  }

  static void storeBytes(uint8_t* p, I v) {
    _mm_storeu_si128(reinterpret_cast<__m128i*>(p),
                     _mm_packus_epi16(_mm256_castsi256_si128(v), _mm256_extracti128_si256(v, 1)));
  }
  static void storeBytes(int8_t* p, I v) {
    _mm_storeu_si128(reinterpret_cast<__m128i*>(p),
                     _mm_packs_epi16(_mm256_castsi256_si128(v), _mm256_extracti128_si256(v, 1)));
  }
  // The values are inside 0 .. 65535, so the unsigned pack saturates nothing.
  static void storeUnsigned(uint16_t* p, I a0, I a1) { storei(p, _mm256_packus_epi32(a0, a1)); }

  static F tapf(const __m128* p) { return _mm256_broadcastss_ps(*p); }
  static D tapd(const __m128d* p) { return _mm256_broadcastsd_pd(*p); }
  static I tap16(const __m128i* p) { return _mm256_broadcastw_epi16(*p); }
  static I tap32(const __m128i* p) { return _mm256_broadcastd_epi32(*p); }
};

#define ZELCV_SEP_INSTANCE(Isa, P, Src, Taps) template ZELCV_SEP_SPAN(Isa, P, Src, Taps)
ZELCV_SEP_SPANS(ZELCV_SEP_INSTANCE, avx2::Isa)

}  // namespace sep
}  // namespace zelcv
