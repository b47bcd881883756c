// Row kernels of grey-level dilation and erosion: one output row from the
// extended source rows that each element of the structuring function reads.
// Every instruction set gives the same bits as the scalar rule in rowScalar.
#ifndef ZELCV_MORPH_GRAYMORPH_KERNELS_H
#define ZELCV_MORPH_GRAYMORPH_KERNELS_H

#include <emmintrin.h>
#include <stdint.h>

#include "kernels/simd.h"

namespace zelcv {
namespace graymorph {

// (Helpers are static: the AVX2 file compiles this header too.)
// One element's value as the kernels want it, 32 bytes in the state.
// 8u: 16 bytes of max(v, 0) then 16 of max(-v, 0), both at most 255, so
// that sat(sat(s + add) - sub) is the saturated s + v and sat(sat(s + sub)
// - add) the saturated s - v. 32f: v four times, then -v four times.
struct alignas(32) ElementValue {
  uint8_t bytes[32];
};

// The helpers below are static: the AVX2 file compiles this header too, and
// must not lend its copies to the baseline code.
static inline uint8_t addPart(const ElementValue& e) { return e.bytes[0]; }
static inline uint8_t subPart(const ElementValue& e) { return e.bytes[16]; }
static inline float valuePart(const ElementValue& e) {
  float v;
  __builtin_memcpy(&v, e.bytes, 4);
  return v;
}

static inline uint8_t satAdd(uint8_t a, uint8_t b) { return uint8_t(a + b > 255 ? 255 : a + b); }
static inline uint8_t satSub(uint8_t a, uint8_t b) { return uint8_t(a > b ? a - b : 0); }

// The rule for pixels [from, to) of the row; sources[k] points at the
// extended row position that output pixel 0 reads for element k.
static inline void rowScalar(bool dilate, const uint8_t* const* sources, const ElementValue* values, int count,
                      uint8_t* dst, int from, int to) {
  for (int x = from; x < to; ++x) {
    uint8_t acc = dilate ? 0 : 255;
    for (int k = 0; k < count; ++k) {
      const uint8_t s = sources[k][x];
      if (dilate) {
        const uint8_t t = satSub(satAdd(s, addPart(values[k])), subPart(values[k]));
        acc = t > acc ? t : acc;
      } else {
        const uint8_t t = satSub(satAdd(s, subPart(values[k])), addPart(values[k]));
        acc = t < acc ? t : acc;
      }
    }
    dst[x] = acc;
  }
}

static inline void rowScalar(bool dilate, const float* const* sources, const ElementValue* values, int count, float* dst,
                      int from, int to) {
  for (int x = from; x < to; ++x) {
    float acc = dilate ? -__builtin_huge_valf() : __builtin_huge_valf();
    for (int k = 0; k < count; ++k) {
      const float v = valuePart(values[k]);
      if (dilate) {
        const float t = sources[k][x] + v;
        acc = t > acc ? t : acc;
      } else {
        const float t = sources[k][x] - v;
        acc = t < acc ? t : acc;
      }
    }
    dst[x] = acc;
  }
}

// The vector operations the kernels use, per instruction set and type.
template <typename T, typename Isa> struct Ops;

template <> struct Ops<uint8_t, simd::Sse2> {
  using V = __m128i;
  static constexpr int kLanes = 16;
  static V load(const uint8_t* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
  static void store(uint8_t* p, V v) { _mm_storeu_si128(reinterpret_cast<__m128i*>(p), v); }
  static V first(const ElementValue& e) { return _mm_load_si128(reinterpret_cast<const __m128i*>(e.bytes)); }
  static V second(const ElementValue& e) {
    return _mm_load_si128(reinterpret_cast<const __m128i*>(e.bytes + 16));
  }
  static V start(bool dilate) { return _mm_set1_epi8(dilate ? 0 : -1); }
  // Positive values (first part only): s + v, or s - v for erosion;
  // negative values (second part only): s - |v|, or s + |v|.
  template <bool kDilate> static V firstTerm(V s, V add, V) {
    return kDilate ? _mm_adds_epu8(s, add) : _mm_subs_epu8(s, add);
  }
  template <bool kDilate> static V secondTerm(V s, V, V sub) {
    return kDilate ? _mm_subs_epu8(s, sub) : _mm_adds_epu8(s, sub);
  }
  static V keepMax(V t, V acc) { return _mm_max_epu8(t, acc); }
  static V keepMin(V t, V acc) { return _mm_min_epu8(t, acc); }
};

template <> struct Ops<float, simd::Sse2> {
  using V = __m128;
  static constexpr int kLanes = 4;
  static V load(const float* p) { return _mm_loadu_ps(p); }
  static void store(float* p, V v) { _mm_storeu_ps(p, v); }
  static V first(const ElementValue& e) { return _mm_load_ps(reinterpret_cast<const float*>(e.bytes)); }
  static V second(const ElementValue& e) { return _mm_load_ps(reinterpret_cast<const float*>(e.bytes + 16)); }
  static V start(bool dilate) { return _mm_set1_ps(dilate ? -__builtin_huge_valf() : __builtin_huge_valf()); }
  // s + v, or s + (-v): the same bits as s - v. Every element is in the
  // first group.
  template <bool kDilate> static V firstTerm(V s, V v, V negV) { return _mm_add_ps(s, kDilate ? v : negV); }
  template <bool kDilate> static V secondTerm(V s, V v, V negV) { return firstTerm<kDilate>(s, v, negV); }
  // (t > acc) ? t : acc, and (t < acc) ? t : acc: NaN terms leave acc.
  static V keepMax(V t, V acc) { return _mm_max_ps(t, acc); }
  static V keepMin(V t, V acc) { return _mm_min_ps(t, acc); }
};

// The elements come in three groups: groups[0] of value 0, then groups[1]
// that need only the first part of their value, then groups[2] that need
// only the second (8u: positive, then negative values; 32f puts every
// element in the middle group, whose term is the full sum).
template <typename T, typename Isa, bool kDilate, int N>
inline void block(const T* const* sources, const ElementValue* values, const int* groups, T* dst, int x) {
  using O = Ops<T, Isa>;
  using V = typename O::V;
  constexpr int L = O::kLanes;
  auto keep = [](V t, V acc) { return kDilate ? O::keepMax(t, acc) : O::keepMin(t, acc); };
  V a[N];
  for (int n = 0; n < N; ++n) a[n] = O::start(kDilate);
  const int zeroEnd = groups[0], firstEnd = zeroEnd + groups[1], end = firstEnd + groups[2];
  int k = 0;
  for (; k < zeroEnd; ++k)
    for (int n = 0; n < N; ++n) a[n] = keep(O::load(sources[k] + x + n * L), a[n]);
  for (; k < firstEnd; ++k) {
    const V p = O::first(values[k]), q = O::second(values[k]);
    for (int n = 0; n < N; ++n) a[n] = keep(O::template firstTerm<kDilate>(O::load(sources[k] + x + n * L), p, q), a[n]);
  }
  for (; k < end; ++k) {
    const V p = O::first(values[k]), q = O::second(values[k]);
    for (int n = 0; n < N; ++n) a[n] = keep(O::template secondTerm<kDilate>(O::load(sources[k] + x + n * L), p, q), a[n]);
  }
  for (int n = 0; n < N; ++n) O::store(dst + x + n * L, a[n]);
}

// Four vectors of output per pass over the elements, then single vectors,
// then the last vector again overlapping (its pixels get the same values).
// In place (dst is the row the sources point into, each output at or left
// of what it reads) the last pixels are taken one by one instead: an
// overlapping vector would read outputs already written.
template <typename T, typename Isa, bool kDilate>
void rowVector(const T* const* sources, const ElementValue* values, const int* groups, T* dst, int width,
               bool inPlace) {
  constexpr int L = Ops<T, Isa>::kLanes;
  int x = 0;
  for (; x + 4 * L <= width; x += 4 * L) block<T, Isa, kDilate, 4>(sources, values, groups, dst, x);
  for (;; x += L) {
    if (x + L > width) {
      if (x == width) return;
      if (inPlace) {
        rowScalar(kDilate, sources, values, groups[0] + groups[1] + groups[2], dst, x, width);
        return;
      }
      x = width - L;
    }
    block<T, Isa, kDilate, 1>(sources, values, groups, dst, x);
    if (x + L == width) return;
  }
}

template <typename T, typename Isa>
void row(bool dilate, const T* const* sources, const ElementValue* values, const int* groups, T* dst, int width,
         bool inPlace) {
  if (width < Ops<T, Isa>::kLanes) {
    rowScalar(dilate, sources, values, groups[0] + groups[1] + groups[2], dst, 0, width);
  } else if (dilate) {
    rowVector<T, Isa, true>(sources, values, groups, dst, width, inPlace);
  } else {
    rowVector<T, Isa, false>(sources, values, groups, dst, width, inPlace);
  }
}

// The AVX2 forms, built in graymorph_avx2.cpp.
void rowAvx2(bool dilate, const uint8_t* const* sources, const ElementValue* values, const int* groups,
             uint8_t* dst, int width, bool inPlace);
void rowAvx2(bool dilate, const float* const* sources, const ElementValue* values, const int* groups, float* dst,
             int width, bool inPlace);

}  // namespace graymorph
}  // namespace zelcv

#endif  // ZELCV_MORPH_GRAYMORPH_KERNELS_H
