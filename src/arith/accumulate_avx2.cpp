// The AVX2 instances of the accumulation kernels, and the 256-bit helpers of
// their blocks: eight pixels per vector, widened straight from memory.
#include "kernels/accumulate.h"
#include "kernels/simd_avx2.h"

namespace zelcv {
namespace avx2 {

// The 256-bit floats of the blocks, with the product formed as a fused
// multiply-add of -0: x * y + -0 rounds once, exactly as x * y does (an
// exact zero product keeps its sign), but some processors take a slow
// assisted path for a plain product that underflows and not for the fused
// form. Running averages of dark pixels settle on subnormal values and stay
// there, so such products come up in every call.
struct AccumulatorFloats : simd::Vec<float, Isa> {
  static Raw mul(Raw a, Raw b) { return _mm256_fmadd_ps(a, b, _mm256_set1_ps(-0.0f)); }
};

}  // namespace avx2

namespace accumulate {

template <> struct Kit<avx2::Isa> {
  using V = avx2::AccumulatorFloats;
  using Keep = __m256;
  static constexpr int kVectors = 4;

  static __m128i load8(const void* p) { return _mm_loadl_epi64(static_cast<const __m128i*>(p)); }
  static __m128i load16(const void* p) { return _mm_loadu_si128(static_cast<const __m128i*>(p)); }

  // Eight elements per vector, converted exactly.
  static void toFloat(const uint8_t* p, __m256 out[4]) {
    for (int i = 0; i < 4; ++i) out[i] = _mm256_cvtepi32_ps(_mm256_cvtepu8_epi32(load8(p + 8 * i)));
  }
  static void toFloat(const int8_t* p, __m256 out[4]) {
    for (int i = 0; i < 4; ++i) out[i] = _mm256_cvtepi32_ps(_mm256_cvtepi8_epi32(load8(p + 8 * i)));
  }
  static void toFloat(const uint16_t* p, __m256 out[4]) {
    for (int i = 0; i < 4; ++i) out[i] = _mm256_cvtepi32_ps(_mm256_cvtepu16_epi32(load16(p + 8 * i)));
  }
  static void toFloat(const float* p, __m256 out[4]) {
    for (int i = 0; i < 4; ++i) out[i] = _mm256_loadu_ps(p + 8 * i);
  }

  // Exact products in 32-bit lanes whose high halves are zero, so that the
  // pairwise multiply-add adds nothing to the low product. Signed bytes only
  // square, so their magnitudes serve.
  static void exactProducts(const uint8_t* p1, const uint8_t* p2, __m256 out[4]) {
    for (int i = 0; i < 4; ++i) {
      __m256i a = _mm256_cvtepu8_epi32(load8(p1 + 8 * i)), b = _mm256_cvtepu8_epi32(load8(p2 + 8 * i));
      out[i] = _mm256_cvtepi32_ps(_mm256_madd_epi16(a, b));
    }
  }
  static void exactProducts(const int8_t* p1, const int8_t*, __m256 out[4]) {
    for (int i = 0; i < 4; ++i) {
      __m256i a = _mm256_abs_epi32(_mm256_cvtepi8_epi32(load8(p1 + 8 * i)));
      out[i] = _mm256_cvtepi32_ps(_mm256_madd_epi16(a, a));
    }
  }

  // All ones in the lanes of pixels whose mask byte is zero.
  static void keepLanes(const uint8_t* mask, __m256 keep[4]) {
    for (int i = 0; i < 4; ++i)
      keep[i] = _mm256_castsi256_ps(
          _mm256_cmpeq_epi32(_mm256_cvtepu8_epi32(load8(mask + 8 * i)), _mm256_setzero_si256()));
  }
  static Selection selection(const uint8_t* mask) {
    __m256i m = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(mask));
    const int zeros = _mm256_movemask_epi8(_mm256_cmpeq_epi8(m, _mm256_setzero_si256()));
    return selectionOf<avx2::Isa>(uint32_t(zeros), 0xFFFFFFFFu);
  }
  static __m256 select(__m256 keep, __m256 old, __m256 updated) { return _mm256_blendv_ps(updated, old, keep); }
};

#define ZELCV_ACCUMULATE_INSTANTIATE(...) template ZELCV_ACCUMULATE_RUN(__VA_ARGS__)
ZELCV_ACCUMULATE_INSTANCES(ZELCV_ACCUMULATE_INSTANTIATE, avx2::Isa)

}  // namespace accumulate
}  // namespace zelcv
