// Per-pixel differences of compound morphology: out = a - b, saturating at 0
// for unsigned types, to the 16-bit range for 16s, and for 32f a float
// subtraction clamped below at 0. `out` may be `a` or `b`.
#ifndef ZELCV_KERNELS_MORPHADV_H
#define ZELCV_KERNELS_MORPHADV_H

#include <stdint.h>

#include "kernels/simd.h"

namespace zelcv {
namespace morphadv {

// The scalar form and the vector form for any vector width `W`; `Isa` names
// the instruction set the code is compiled for.
template <typename T, typename Isa = simd::Sse2> struct Difference {
  static T s(T a, T b) { return a > b ? T(a - b) : T(0); }
  template <typename W>
  static typename W::Raw v(typename W::Raw a, typename W::Raw b) { return W::subs(a, b); }
};
template <typename Isa> struct Difference<int16_t, Isa> {
  static int16_t s(int16_t a, int16_t b) {
    const int d = int(a) - int(b);
    return int16_t(d > 32767 ? 32767 : d < -32768 ? -32768 : d);
  }
  template <typename W>
  static typename W::Raw v(typename W::Raw a, typename W::Raw b) { return W::subs(a, b); }
};
// The clamp is written as `d > 0 ? d : 0` so that the scalar tail and the
// vector max(d, 0) agree, NaN included (both give 0).
template <typename Isa> struct Difference<float, Isa> {
  static float s(float a, float b) {
    const float d = a - b;
    return d > 0.0f ? d : 0.0f;
  }
  template <typename W>
  static typename W::Raw v(typename W::Raw a, typename W::Raw b) { return W::max(W::sub(a, b), W::set1(0.0f)); }
};

// One row of n elements with the vectors of `Isa`, then 16-byte vectors,
// then single elements.
template <typename T, typename Isa>
void differenceRow(const T* a, const T* b, T* out, int n) {
  using V = simd::Vec<T, Isa>;
  using P = simd::Vec<T>;
  int i = 0;
  for (; i + 2 * V::kLanes <= n; i += 2 * V::kLanes) {
    const auto d0 = Difference<T, Isa>::template v<V>(V::loadu(a + i), V::loadu(b + i));
    const auto d1 = Difference<T, Isa>::template v<V>(V::loadu(a + i + V::kLanes), V::loadu(b + i + V::kLanes));
    V::storeu(out + i, d0);
    V::storeu(out + i + V::kLanes, d1);
  }
  for (; i + P::kLanes <= n; i += P::kLanes)
    P::storeu(out + i, Difference<T, Isa>::template v<P>(P::loadu(a + i), P::loadu(b + i)));
  // Rows of 32f images may be misaligned for their elements.
  for (; i < n; ++i) simd::storeOne(out + i, Difference<T, Isa>::s(simd::loadOne(a + i), simd::loadOne(b + i)));
}

// Built in morph_core_avx2.cpp.
extern template void differenceRow<uint8_t, avx2::Isa>(const uint8_t*, const uint8_t*, uint8_t*, int);
extern template void differenceRow<uint16_t, avx2::Isa>(const uint16_t*, const uint16_t*, uint16_t*, int);
extern template void differenceRow<int16_t, avx2::Isa>(const int16_t*, const int16_t*, int16_t*, int);
extern template void differenceRow<float, avx2::Isa>(const float*, const float*, float*, int);

template <typename T>
inline void difference(const T* a, const T* b, T* out, int n) {
  differenceRow<T, simd::Sse2>(a, b, out, n);
}

}  // namespace morphadv
}  // namespace zelcv

#endif  // ZELCV_KERNELS_MORPHADV_H
