// The AVX2 part of the sub-pixel window rows: eight columns per step with
// the SSE2 rows' products and sums in the same order, so the same bits.
#include <immintrin.h>
#include <string.h>

#include "kernels/simd_avx2.h"
#include "stats/subpix.h"

namespace zelcv {
namespace avx2 {
namespace {

inline __m256 subpixLoad8(const float* p) { return _mm256_loadu_ps(p); }
inline __m256 subpixLoad8(const uint8_t* p) {
  return _mm256_cvtepi32_ps(_mm256_cvtepu8_epi32(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p))));
}
inline __m256 subpixLoad8(const uint16_t* p) {
  return _mm256_cvtepi32_ps(_mm256_cvtepu16_epi32(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p))));
}

inline void subpixPut8(float* d, __m256 v) { _mm256_storeu_ps(d, v); }
// Rounded to nearest as the SSE2 rows round; the sums lie within 0..255.
inline void subpixPut8(uint8_t* d, __m256 v) {
  const __m256i i = _mm256_cvtps_epi32(v);
  __m128i w = _mm_packs_epi32(_mm256_castsi256_si128(i), _mm256_extracti128_si256(i, 1));
  _mm_storel_epi64(reinterpret_cast<__m128i*>(d), _mm_packus_epi16(w, w));
}

template <typename S, typename D>
void interior(const S* a0, const S* a1, D* d, int lo, int hi, const subpix::Placement& p) {
  const __m256 w00 = _mm256_set1_ps(p.w00), w01 = _mm256_set1_ps(p.w01), w10 = _mm256_set1_ps(p.w10),
               w11 = _mm256_set1_ps(p.w11);
  auto eight = [&](int at) {
    __m256 v = _mm256_add_ps(_mm256_mul_ps(subpixLoad8(a0 + at), w00), _mm256_mul_ps(subpixLoad8(a0 + at + 1), w01));
    v = _mm256_add_ps(v, _mm256_mul_ps(subpixLoad8(a1 + at), w10));
    v = _mm256_add_ps(v, _mm256_mul_ps(subpixLoad8(a1 + at + 1), w11));
    subpixPut8(d + at, v);
  };
  int i = lo;
  for (; i + 8 <= hi; i += 8) eight(i);
  if (i < hi) eight(hi - 8);
}

}  // namespace

void subpixInterior(const uint8_t* a0, const uint8_t* a1, uint8_t* d, int lo, int hi, const subpix::Placement& p) {
  interior(a0, a1, d, lo, hi, p);
}
void subpixInterior(const uint8_t* a0, const uint8_t* a1, float* d, int lo, int hi, const subpix::Placement& p) {
  interior(a0, a1, d, lo, hi, p);
}
void subpixInterior(const uint16_t* a0, const uint16_t* a1, float* d, int lo, int hi, const subpix::Placement& p) {
  interior(a0, a1, d, lo, hi, p);
}
void subpixInterior(const float* a0, const float* a1, float* d, int lo, int hi, const subpix::Placement& p) {
  interior(a0, a1, d, lo, hi, p);
}

}  // namespace avx2
}  // namespace zelcv
