// The AVX-512 instances of the accumulation kernels, and the 512-bit helpers
// of their blocks: sixteen pixels per vector, widened straight from memory,
// with mask registers saying which lanes keep their old value.
#include "kernels/simd_avx512.h"  // first: see there
#include "kernels/accumulate.h"

namespace zelcv {
namespace avx512 {

// Products through the fused unit with a -0 addend, as in the AVX2 blocks:
// the same rounding as the plain product without the slow underflow path.
struct AccumulatorFloats : simd::Vec<float, Isa> {
  static Raw mul(Raw a, Raw b) { return _mm512_fmadd_ps(a, b, _mm512_set1_ps(-0.0f)); }
};

}  // namespace avx512

namespace accumulate {

template <> struct Kit<avx512::Isa> {
  using V = avx512::AccumulatorFloats;
  using Keep = __mmask16;
  // Two vectors, 128 bytes of each 32f stream per block: with four, the
  // in-place rows with two 32f sources ran a third slower on caches that
  // hold the images, and no row gained.
  static constexpr int kVectors = 2;

  static __m128i load16(const void* p) { return _mm_loadu_si128(static_cast<const __m128i*>(p)); }
  static __m256i load32(const void* p) { return _mm256_loadu_si256(static_cast<const __m256i*>(p)); }

  // Sixteen elements per vector, converted exactly.
  static void toFloat(const uint8_t* p, __m512 out[kVectors]) {
    for (int i = 0; i < kVectors; ++i) out[i] = _mm512_cvtepi32_ps(_mm512_cvtepu8_epi32(load16(p + 16 * i)));
  }
  static void toFloat(const int8_t* p, __m512 out[kVectors]) {
    for (int i = 0; i < kVectors; ++i) out[i] = _mm512_cvtepi32_ps(_mm512_cvtepi8_epi32(load16(p + 16 * i)));
  }
  static void toFloat(const uint16_t* p, __m512 out[kVectors]) {
    for (int i = 0; i < kVectors; ++i) out[i] = _mm512_cvtepi32_ps(_mm512_cvtepu16_epi32(load32(p + 16 * i)));
  }
  static void toFloat(const float* p, __m512 out[kVectors]) {
    for (int i = 0; i < kVectors; ++i) out[i] = _mm512_loadu_ps(p + 16 * i);
  }

  // Exact products in 32-bit lanes whose high halves are zero (see AVX2).
  static void exactProducts(const uint8_t* p1, const uint8_t* p2, __m512 out[kVectors]) {
    for (int i = 0; i < kVectors; ++i) {
      __m512i a = _mm512_cvtepu8_epi32(load16(p1 + 16 * i)), b = _mm512_cvtepu8_epi32(load16(p2 + 16 * i));
      out[i] = _mm512_cvtepi32_ps(_mm512_madd_epi16(a, b));
    }
  }
  static void exactProducts(const int8_t* p1, const int8_t*, __m512 out[kVectors]) {
    for (int i = 0; i < kVectors; ++i) {
      __m512i a = _mm512_abs_epi32(_mm512_cvtepi8_epi32(load16(p1 + 16 * i)));
      out[i] = _mm512_cvtepi32_ps(_mm512_madd_epi16(a, a));
    }
  }

  // Bit i of the result: mask byte i is zero, for the 32 bytes of a block.
  static uint32_t zeroBytes(const uint8_t* mask) {
    return uint32_t(_mm512_cmpeq_epi8_mask(_mm512_zextsi256_si512(load32(mask)), _mm512_setzero_si512()));
  }
  static void keepLanes(const uint8_t* mask, __mmask16 keep[kVectors]) {
    const uint32_t zeros = zeroBytes(mask);
    for (int i = 0; i < kVectors; ++i) keep[i] = __mmask16(zeros >> (16 * i));
  }
  static Selection selection(const uint8_t* mask) {
    return selectionOf<avx512::Isa>(zeroBytes(mask), 0xFFFFFFFFu);
  }
  static __m512 select(__mmask16 keep, __m512 old, __m512 updated) {
    return _mm512_mask_blend_ps(keep, updated, old);
  }
};

#define ZELCV_ACCUMULATE_INSTANTIATE(...) template ZELCV_ACCUMULATE_RUN(__VA_ARGS__)
ZELCV_ACCUMULATE_INSTANCES(ZELCV_ACCUMULATE_INSTANTIATE, avx512::Isa)

}  // namespace accumulate
}  // namespace zelcv
