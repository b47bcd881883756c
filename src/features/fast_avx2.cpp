// FAST rows with AVX2: 32 centres at a time, the same corner test as the
// 16-wide one, so the same corners and scores.
#include <immintrin.h>

#include "features/fast_kernels.h"

namespace zelcv {
namespace avx2 {
namespace {

struct Lanes32 {
  using R = __m256i;
  static constexpr int kWidth = 32;
  static R load(const Zel8u* p) { return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)); }
  static R set1(int v) { return _mm256_set1_epi8(char(v)); }
  static R zero() { return _mm256_setzero_si256(); }
  static R adds(R a, R b) { return _mm256_adds_epu8(a, b); }
  static R subs(R a, R b) { return _mm256_subs_epu8(a, b); }
  static R min(R a, R b) { return _mm256_min_epu8(a, b); }
  static R max(R a, R b) { return _mm256_max_epu8(a, b); }
  static R eq(R a, R b) { return _mm256_cmpeq_epi8(a, b); }
  static R sub(R a, R b) { return _mm256_sub_epi8(a, b); }
  static R andNot(R a, R b) { return _mm256_andnot_si256(a, b); }
  static uint32_t nonZeroBits(R a) { return ~uint32_t(_mm256_movemask_epi8(_mm256_cmpeq_epi8(a, zero()))); }
};

}  // namespace

int fastScoreRow(const fast::Circle& c, const Zel8u* row, int width, int threshold, int arc, Zel8u* out) {
  return fast::scoreRow<Lanes32>(c, row, width, threshold, arc, out);
}

}  // namespace avx2
}  // namespace zelcv
