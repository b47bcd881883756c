// The baseline instances of the pyramid layers' inner loops (SSE2).
#include <emmintrin.h>

#include "filter/pyramid_layer_kernels.h"

namespace zelcv {
namespace layer {

// Eight columns per step: for each pair of taps, the sixteen bytes from the
// pair's first tap as words, multiplied and summed pairwise (pmaddwd) into
// the columns' 32-bit sums; exact, so the pair order does not matter.
template <>
int evenColumns8u<simd::Sse2>(const uint8_t* q, int avail, const int16_t* taps, int kerSize, int count, float unit,
                              float* out) {
  const int pairs = (kerSize + 1) / 2;
  const __m128i zero = _mm_setzero_si128();
  const __m128 scale = _mm_set1_ps(unit);
  int j = 0;
  for (; j + 8 <= count && 2 * j + 2 * (pairs - 1) + 16 <= avail; j += 8) {
    __m128i lo = zero, hi = zero;
    for (int p = 0; p < pairs; ++p) {
      const __m128i t = _mm_set1_epi32(int32_t(uint16_t(taps[2 * p])) | int32_t(uint32_t(uint16_t(taps[2 * p + 1])) << 16));
      const __m128i b = _mm_loadu_si128(reinterpret_cast<const __m128i*>(q + 2 * j + 2 * p));
      lo = _mm_add_epi32(lo, _mm_madd_epi16(_mm_unpacklo_epi8(b, zero), t));
      hi = _mm_add_epi32(hi, _mm_madd_epi16(_mm_unpackhi_epi8(b, zero), t));
    }
    _mm_storeu_ps(out + j, _mm_mul_ps(_mm_cvtepi32_ps(lo), scale));
    _mm_storeu_ps(out + j + 4, _mm_mul_ps(_mm_cvtepi32_ps(hi), scale));
  }
  return j;
}

template <>
void weightedRows<simd::Sse2>(const float* const* rows, const float* taps, int kerSize, int n, float* out) {
  int i = 0;
  for (; i + 4 <= n; i += 4) {
    __m128 acc = _mm_mul_ps(_mm_set1_ps(taps[0]), _mm_loadu_ps(rows[0] + i));
    for (int k = 1; k < kerSize; ++k) acc = _mm_add_ps(acc, _mm_mul_ps(_mm_set1_ps(taps[k]), _mm_loadu_ps(rows[k] + i)));
    _mm_storeu_ps(out + i, acc);
  }
  for (; i < n; ++i) {
    float acc = taps[0] * rows[0][i];
    for (int k = 1; k < kerSize; ++k) acc += taps[k] * rows[k][i];
    out[i] = acc;
  }
}

template <>
void floatsToBytes<simd::Sse2>(const float* f, int n, uint8_t* d) {
  const __m128 half = _mm_set1_ps(0.5f), top = _mm_set1_ps(255.0f), zero = _mm_setzero_ps();
  // max() returns its second operand for a NaN: the zero.
  auto toInt = [&](const float* p) {
    return _mm_cvttps_epi32(_mm_min_ps(_mm_max_ps(_mm_add_ps(_mm_loadu_ps(p), half), zero), top));
  };
  int i = 0;
  for (; i + 8 <= n; i += 8) {
    const __m128i w16 = _mm_packs_epi32(toInt(f + i), toInt(f + i + 4));
    _mm_storel_epi64(reinterpret_cast<__m128i*>(d + i), _mm_packus_epi16(w16, w16));
  }
  for (; i < n; ++i) {
    const float t = f[i] + 0.5f;
    d[i] = !(t > 0.0f) ? 0 : t >= 255.0f ? 255 : uint8_t(int(t));
  }
}

}  // namespace layer
}  // namespace zelcv
