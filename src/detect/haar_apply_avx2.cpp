// The AVX2 kernels of the Haar classifier: eight windows at once.
#include <immintrin.h>

#include "detect/haar_kernels.h"

namespace zelcv {
namespace haar {
namespace avx2 {
namespace {

struct Avx2Ops {
  static constexpr int kLanes = 8;
  using F = __m256;
  using I = __m256i;
  static F zero() { return _mm256_setzero_ps(); }
  static I zeroI() { return _mm256_setzero_si256(); }
  static F loadF(const float* p) { return _mm256_loadu_ps(p); }
  static I loadI(const int32_t* p) { return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)); }
  static F set1(float v) { return _mm256_set1_ps(v); }
  static F add(F a, F b) { return _mm256_add_ps(a, b); }
  static F sub(F a, F b) { return _mm256_sub_ps(a, b); }
  static F mul(F a, F b) { return _mm256_mul_ps(a, b); }
  static I addI(I a, I b) { return _mm256_add_epi32(a, b); }
  static I subI(I a, I b) { return _mm256_sub_epi32(a, b); }
  static I mulI(I a, int32_t w) { return _mm256_mullo_epi32(a, _mm256_set1_epi32(w)); }
  static F toFloat(I a) { return _mm256_cvtepi32_ps(a); }
  static F lessThan(F a, F b) { return _mm256_cmp_ps(a, b, _CMP_LT_OQ); }
  static F select(F m, F a, F b) { return _mm256_blendv_ps(b, a, m); }
  static int signs(F m) { return _mm256_movemask_ps(m); }
};

}  // namespace

int64_t apply(const ApplyArgs& a, const float*) { return applyRows<Avx2Ops, float>(a); }
int64_t apply(const ApplyArgs& a, const int32_t*) { return applyRows<Avx2Ops, int32_t>(a); }

}  // namespace avx2
}  // namespace haar
}  // namespace zelcv
