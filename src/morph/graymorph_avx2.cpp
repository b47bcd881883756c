// The AVX2 row kernels of grey-level dilation and erosion: twice the lanes of
// the baseline's, the same operations in the same order.
#include <immintrin.h>

#include "kernels/simd_avx2.h"
#include "morph/graymorph_kernels.h"

namespace zelcv {
namespace graymorph {

template <> struct Ops<uint8_t, avx2::Isa> {
  using V = __m256i;
  static constexpr int kLanes = 32;
  static V load(const uint8_t* p) { return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)); }
  static void store(uint8_t* p, V v) { _mm256_storeu_si256(reinterpret_cast<__m256i*>(p), v); }
  static V first(const ElementValue& e) {
    return _mm256_broadcastsi128_si256(_mm_load_si128(reinterpret_cast<const __m128i*>(e.bytes)));
  }
  static V second(const ElementValue& e) {
    return _mm256_broadcastsi128_si256(_mm_load_si128(reinterpret_cast<const __m128i*>(e.bytes + 16)));
  }
  static V start(bool dilate) { return _mm256_set1_epi8(dilate ? 0 : -1); }
  template <bool kDilate> static V firstTerm(V s, V add, V) {
    return kDilate ? _mm256_adds_epu8(s, add) : _mm256_subs_epu8(s, add);
  }
  template <bool kDilate> static V secondTerm(V s, V, V sub) {
    return kDilate ? _mm256_subs_epu8(s, sub) : _mm256_adds_epu8(s, sub);
  }
  static V keepMax(V t, V acc) { return _mm256_max_epu8(t, acc); }
  static V keepMin(V t, V acc) { return _mm256_min_epu8(t, acc); }
};

template <> struct Ops<float, avx2::Isa> {
  using V = __m256;
  static constexpr int kLanes = 8;
  static V load(const float* p) { return _mm256_loadu_ps(p); }
  static void store(float* p, V v) { _mm256_storeu_ps(p, v); }
  static V first(const ElementValue& e) { return _mm256_broadcast_ps(reinterpret_cast<const __m128*>(e.bytes)); }
  static V second(const ElementValue& e) {
    return _mm256_broadcast_ps(reinterpret_cast<const __m128*>(e.bytes + 16));
  }
  static V start(bool dilate) {
    return _mm256_set1_ps(dilate ? -__builtin_huge_valf() : __builtin_huge_valf());
  }
  template <bool kDilate> static V firstTerm(V s, V v, V negV) { return _mm256_add_ps(s, kDilate ? v : negV); }
  template <bool kDilate> static V secondTerm(V s, V v, V negV) { return firstTerm<kDilate>(s, v, negV); }
  static V keepMax(V t, V acc) { return _mm256_max_ps(t, acc); }
  static V keepMin(V t, V acc) { return _mm256_min_ps(t, acc); }
};

void rowAvx2(bool dilate, const uint8_t* const* sources, const ElementValue* values, const int* groups,
             uint8_t* dst, int width, bool inPlace) {
  row<uint8_t, avx2::Isa>(dilate, sources, values, groups, dst, width, inPlace);
}

void rowAvx2(bool dilate, const float* const* sources, const ElementValue* values, const int* groups, float* dst,
             int width, bool inPlace) {
  row<float, avx2::Isa>(dilate, sources, values, groups, dst, width, inPlace);
}

}  // namespace graymorph
}  // namespace zelcv
