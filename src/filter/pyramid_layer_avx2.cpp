// The AVX2 instances of the pyramid layers' inner loops: the baseline's
// arithmetic on eight lanes, then the baseline itself for what is left.
#include "filter/pyramid_layer_kernels.h"
#include "kernels/simd_avx2.h"

namespace zelcv {
namespace layer {

template <>
int evenColumns8u<avx2::Isa>(const uint8_t* q, int avail, const int16_t* taps, int kerSize, int count, float unit,
                             float* out) {
  const int pairs = (kerSize + 1) / 2;
  const __m256 scale = _mm256_set1_ps(unit);
  int j = 0;
  // Eight columns from sixteen bytes widened to words, in column order.
  for (; j + 8 <= count && 2 * j + 2 * (pairs - 1) + 16 <= avail; j += 8) {
    __m256i acc = _mm256_setzero_si256();
    for (int p = 0; p < pairs; ++p) {
      const __m256i t =
          _mm256_set1_epi32(int32_t(uint16_t(taps[2 * p])) | int32_t(uint32_t(uint16_t(taps[2 * p + 1])) << 16));
      const __m256i b =
          _mm256_cvtepu8_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i*>(q + 2 * j + 2 * p)));
      acc = _mm256_add_epi32(acc, _mm256_madd_epi16(b, t));
    }
    _mm256_storeu_ps(out + j, _mm256_mul_ps(_mm256_cvtepi32_ps(acc), scale));
  }
  return j;
}

template <>
void weightedRows<avx2::Isa>(const float* const* rows, const float* taps, int kerSize, int n, float* out) {
  int i = 0;
  for (; i + 8 <= n; i += 8) {
    __m256 acc = _mm256_mul_ps(_mm256_set1_ps(taps[0]), _mm256_loadu_ps(rows[0] + i));
    for (int k = 1; k < kerSize; ++k)
      acc = _mm256_add_ps(acc, _mm256_mul_ps(_mm256_set1_ps(taps[k]), _mm256_loadu_ps(rows[k] + i)));
    _mm256_storeu_ps(out + i, acc);
  }
  if (i < n) {
    const float* rest[64];
    for (int k = 0; k < kerSize; ++k) rest[k] = rows[k] + i;
    weightedRows<simd::Sse2>(rest, taps, kerSize, n - i, out + i);
  }
}

template <>
void floatsToBytes<avx2::Isa>(const float* f, int n, uint8_t* d) {
  const __m256 half = _mm256_set1_ps(0.5f), top = _mm256_set1_ps(255.0f), zero = _mm256_setzero_ps();
  // max() returns its second operand for a NaN: the zero.
  auto toInt = [&](const float* p) {
    return _mm256_cvttps_epi32(_mm256_min_ps(_mm256_max_ps(_mm256_add_ps(_mm256_loadu_ps(p), half), zero), top));
  };
  int i = 0;
  for (; i + 16 <= n; i += 16) {
    // Packing works within 128-bit halves: restore the order afterwards.
    const __m256i w16 = _mm256_permute4x64_epi64(_mm256_packs_epi32(toInt(f + i), toInt(f + i + 8)), 0xD8);
    const __m128i b8 = _mm_packus_epi16(_mm256_castsi256_si128(w16), _mm256_extracti128_si256(w16, 1));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(d + i), b8);
  }
  floatsToBytes<simd::Sse2>(f + i, n - i, d + i);
}

}  // namespace layer
}  // namespace zelcv
