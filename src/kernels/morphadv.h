// Per-pixel differences of compound morphology: out = a - b, saturating at 0
// for unsigned types, to the 16-bit range for 16s, and for 32f a float
// subtraction clamped below at 0. `out` may be `a` or `b`.
#ifndef ZELCV_KERNELS_MORPHADV_H
#define ZELCV_KERNELS_MORPHADV_H

#include <stdint.h>

#include "kernels/simd.h"

namespace zelcv {
namespace morphadv {

template <typename T> struct Difference;

template <> struct Difference<uint8_t> {
  static uint8_t s(uint8_t a, uint8_t b) { return a > b ? uint8_t(a - b) : uint8_t(0); }
  static __m128i v(__m128i a, __m128i b) { return _mm_subs_epu8(a, b); }
};
template <> struct Difference<uint16_t> {
  static uint16_t s(uint16_t a, uint16_t b) { return a > b ? uint16_t(a - b) : uint16_t(0); }
  static __m128i v(__m128i a, __m128i b) { return _mm_subs_epu16(a, b); }
};
template <> struct Difference<int16_t> {
  static int16_t s(int16_t a, int16_t b) {
    const int d = int(a) - int(b);
    return int16_t(d > 32767 ? 32767 : d < -32768 ? -32768 : d);
  }
  static __m128i v(__m128i a, __m128i b) { return _mm_subs_epi16(a, b); }
};
// The clamp is written as `d > 0 ? d : 0` so that the scalar tail and
// _mm_max_ps(d, 0) agree, NaN included (both give 0).
template <> struct Difference<float> {
  static float s(float a, float b) {
    const float d = a - b;
    return d > 0.0f ? d : 0.0f;
  }
  static __m128 v(__m128 a, __m128 b) { return _mm_max_ps(_mm_sub_ps(a, b), _mm_setzero_ps()); }
};

template <typename T>
inline void difference(const T* a, const T* b, T* out, int n) {
  using V = simd::Vec<T>;
  constexpr int L = V::kLanes;
  int i = 0;
  for (; i + 2 * L <= n; i += 2 * L) {
    const auto d0 = Difference<T>::v(V::loadu(a + i), V::loadu(b + i));
    const auto d1 = Difference<T>::v(V::loadu(a + i + L), V::loadu(b + i + L));
    V::storeu(out + i, d0);
    V::storeu(out + i + L, d1);
  }
  for (; i + L <= n; i += L) V::storeu(out + i, Difference<T>::v(V::loadu(a + i), V::loadu(b + i)));
  for (; i < n; ++i) out[i] = Difference<T>::s(a[i], b[i]);
}

}  // namespace morphadv
}  // namespace zelcv

#endif  // ZELCV_KERNELS_MORPHADV_H
