// The AVX2 forms of the integer derivative engine's rows: the same 16-bit
// arithmetic on sixteen lanes, so the same integers as the SSE2 form.
#include "filter/derivative_ops.h"
#include "kernels/simd_avx2.h"

namespace zelcv {
namespace deriv {

template <> struct VectorOps<avx2::Isa> {
  using V = __m256i;
  static constexpr bool kVector = true;
  static constexpr int kLanes = 16;
  static V zero() { return _mm256_setzero_si256(); }
  static V set(int c) { return _mm256_set1_epi16(short(c)); }
  static V add(V a, V b) { return _mm256_add_epi16(a, b); }
  static V sub(V a, V b) { return _mm256_sub_epi16(a, b); }
  template <int C> static V mul(V v) {
    if constexpr (C == 1) return v;
    else if constexpr (C == 2) return _mm256_add_epi16(v, v);
    else if constexpr (C == 4) return _mm256_slli_epi16(v, 2);
    else if constexpr (C == 8) return _mm256_slli_epi16(v, 3);
    else return _mm256_mullo_epi16(v, _mm256_set1_epi16(C));
  }
  template <int S> static V srai(V v) { return _mm256_srai_epi16(v, S); }
  template <int S> static V srli(V v) { return _mm256_srli_epi16(v, S); }
  static V mulhiu(V a, V b) { return _mm256_mulhi_epu16(a, b); }
  static V load16(const Zel16s* p) { return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)); }
  // The widening conversion keeps element order across the 128-bit halves.
  static void loadBytes(const Zel8u* p, V& lo, V& hi) {
    lo = _mm256_cvtepu8_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p)));
    hi = _mm256_cvtepu8_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p + 16)));
  }
  static void store16(Zel16s* p, V v) { _mm256_storeu_si256(reinterpret_cast<__m256i*>(p), v); }
  // The packs work within 128-bit halves: pack the two halves together.
  static void storeS8(Zel8s* p, V v) {
    _mm_storeu_si128(reinterpret_cast<__m128i*>(p),
                     _mm_packs_epi16(_mm256_castsi256_si128(v), _mm256_extracti128_si256(v, 1)));
  }
  static void storeU8(Zel8u* p, V v) {
    _mm_storeu_si128(reinterpret_cast<__m128i*>(p),
                     _mm_packus_epi16(_mm256_castsi256_si128(v), _mm256_extracti128_si256(v, 1)));
  }
};

#define ZELCV_DERIV_INSTANCE_AVX2(...) template ZELCV_DERIV_ROW(avx2::Isa, __VA_ARGS__)
ZELCV_DERIV_SINKS(ZELCV_DERIV_INSTANCE_AVX2)

}  // namespace deriv
}  // namespace zelcv
