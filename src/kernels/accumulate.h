// Kernels that update a 32f accumulator from one or two sources: a formula
// (one scalar and one vector form, the same single-precision operations in
// the same order) applied per pixel, optionally under an 8u mask.
#ifndef ZELCV_KERNELS_ACCUMULATE_H
#define ZELCV_KERNELS_ACCUMULATE_H

#include <stdint.h>
#include <string.h>

#include <type_traits>

#include "kernels/row_driver.h"
#include "kernels/simd.h"

namespace zelcv {
namespace accumulate {

// Widening of integer lanes: bytes to 16-bit lanes (lo16, hi16: the low and
// high eight of sixteen), and 16-bit lanes to floats (lo, hi: the low and
// high four of eight). All exact.
template <typename T> struct Widen;

template <> struct Widen<uint8_t> {
  static __m128i lo16(__m128i v) { return _mm_unpacklo_epi8(v, _mm_setzero_si128()); }
  static __m128i hi16(__m128i v) { return _mm_unpackhi_epi8(v, _mm_setzero_si128()); }
  static __m128 lo(__m128i v) { return _mm_cvtepi32_ps(_mm_unpacklo_epi16(v, _mm_setzero_si128())); }
  static __m128 hi(__m128i v) { return _mm_cvtepi32_ps(_mm_unpackhi_epi16(v, _mm_setzero_si128())); }
};
template <> struct Widen<uint16_t> : Widen<uint8_t> {};

// Sign extension: the value lands in the high half of a wider lane, then an
// arithmetic shift brings it down.
template <> struct Widen<int8_t> {
  static __m128i lo16(__m128i v) { return _mm_srai_epi16(_mm_unpacklo_epi8(v, v), 8); }
  static __m128i hi16(__m128i v) { return _mm_srai_epi16(_mm_unpackhi_epi8(v, v), 8); }
  static __m128 lo(__m128i v) { return _mm_cvtepi32_ps(_mm_srai_epi32(_mm_unpacklo_epi16(v, v), 16)); }
  static __m128 hi(__m128i v) { return _mm_cvtepi32_ps(_mm_srai_epi32(_mm_unpackhi_epi16(v, v), 16)); }
};

// Sixteen 16-bit lanes (two vectors) as four float vectors.
template <typename T>
inline void toFloats(__m128i low, __m128i high, __m128 out[4]) {
  out[0] = Widen<T>::lo(low);
  out[1] = Widen<T>::hi(low);
  out[2] = Widen<T>::lo(high);
  out[3] = Widen<T>::hi(high);
}

inline __m128i loadu(const void* p) { return _mm_loadu_si128(static_cast<const __m128i*>(p)); }
inline __m128i load4Bytes(const void* p) {
  int32_t bits;
  memcpy(&bits, p, 4);
  return _mm_cvtsi32_si128(bits);
}

// Exact conversion of source elements to single precision: four (a vector
// part) or sixteen (a block, as four vectors). Bytes first.
template <typename T> struct ToFloat {
  static void block(const T* p, __m128 out[4]) {
    __m128i v = loadu(p);
    toFloats<T>(Widen<T>::lo16(v), Widen<T>::hi16(v), out);
  }
  static __m128 part(const T* p) { return Widen<T>::lo(Widen<T>::lo16(load4Bytes(p))); }
};

template <> struct ToFloat<uint16_t> {
  static void block(const uint16_t* p, __m128 out[4]) { toFloats<uint16_t>(loadu(p), loadu(p + 8), out); }
  static __m128 part(const uint16_t* p) {
    return Widen<uint16_t>::lo(_mm_loadl_epi64(static_cast<const __m128i*>(static_cast<const void*>(p))));
  }
};

template <> struct ToFloat<float> {
  static void block(const float* p, __m128 out[4]) {
    for (int i = 0; i < 4; ++i) out[i] = _mm_loadu_ps(p + 4 * i);
  }
  static __m128 part(const float* p) { return _mm_loadu_ps(p); }
};

// Products of 8-bit sources, formed exactly in 16-bit lanes and then
// converted: they stay below 2^24, so they equal the single-precision product
// of the converted sources (signed zeros aside), at a fraction of the
// conversions.
template <typename T>
inline void exactProducts(const T* p1, const T* p2, __m128 out[4]) {
  using W = Widen<T>;
  __m128i a = loadu(p1), b = loadu(p2);
  toFloats<T>(_mm_mullo_epi16(W::lo16(a), W::lo16(b)), _mm_mullo_epi16(W::hi16(a), W::hi16(b)), out);
}
template <typename T>
inline __m128 exactProducts(const T* p1, const T* p2) {
  using W = Widen<T>;
  return W::lo(_mm_mullo_epi16(W::lo16(load4Bytes(p1)), W::lo16(load4Bytes(p2))));
}

// Lane masks that select the pixels whose mask byte is zero (kept as they
// were): all ones in the 32-bit lane of such a pixel.
// `zero` holds 0xFF for each mask byte that is zero.
inline void keepLanes(__m128i zero, __m128 keep[4]) {
  __m128i l = _mm_unpacklo_epi8(zero, zero), h = _mm_unpackhi_epi8(zero, zero);
  keep[0] = _mm_castsi128_ps(_mm_unpacklo_epi16(l, l));
  keep[1] = _mm_castsi128_ps(_mm_unpackhi_epi16(l, l));
  keep[2] = _mm_castsi128_ps(_mm_unpacklo_epi16(h, h));
  keep[3] = _mm_castsi128_ps(_mm_unpackhi_epi16(h, h));
}
inline __m128 keepLanes(const uint8_t* mask) {
  __m128i zero = _mm_cmpeq_epi8(load4Bytes(mask), _mm_setzero_si128());
  zero = _mm_unpacklo_epi8(zero, zero);
  return _mm_castsi128_ps(_mm_unpacklo_epi16(zero, zero));
}
// The old bits where `keep` is set, the new value elsewhere.
inline __m128 select(__m128 keep, __m128 old, __m128 updated) {
  return _mm_or_ps(_mm_and_ps(keep, old), _mm_andnot_ps(keep, updated));
}

// The formulas: a is the accumulator, s1 and s2 the converted sources.
// kProduct: the formula is a + s1 x s2 (s2 = s1 for a square), so an exact
// product may be passed to the plain sum instead.
struct Add {
  static constexpr bool kProduct = false;
  float operator()(float a, float s, float) const { return a + s; }
  __m128 operator()(__m128 a, __m128 s, __m128) const { return _mm_add_ps(a, s); }
};
struct AddSquare {
  static constexpr bool kProduct = true;
  float operator()(float a, float s, float) const { return a + s * s; }
  __m128 operator()(__m128 a, __m128 s, __m128) const { return _mm_add_ps(a, _mm_mul_ps(s, s)); }
};
struct AddProduct {
  static constexpr bool kProduct = true;
  float operator()(float a, float s1, float s2) const { return a + s1 * s2; }
  __m128 operator()(__m128 a, __m128 s1, __m128 s2) const { return _mm_add_ps(a, _mm_mul_ps(s1, s2)); }
};
// The running average as one subtraction, one product and one sum.
struct AddWeighted {
  static constexpr bool kProduct = false;
  float alpha;
  float operator()(float a, float s, float) const { return (s - a) * alpha + a; }
  __m128 operator()(__m128 a, __m128 s, __m128) const {
    return _mm_add_ps(_mm_mul_ps(_mm_sub_ps(s, a), _mm_set1_ps(alpha)), a);
  }
};

// One row of an update. With kInPlace the accumulator read is the one
// written (so its vector loads are aligned); otherwise it is a separate image.
template <typename Src, int kSources, bool kMasked, bool kInPlace, typename Formula>
class Row {
 public:
  static constexpr int kBlock = 16;
  static constexpr int kPart = 4;

  Row(const Src* src1, const Src* src2, const uint8_t* mask, const float* acc, float* out, const Formula& f)
      : src1_(src1), src2_(src2), mask_(mask), acc_(acc), out_(out), f_(f) {}

  const float* written() const { return out_; }

  void one(int x) {
    if (kMasked && !mask_[x]) return;
    float s2 = kSources == 2 ? float(src2_[x]) : 0.0f;
    out_[x] = f_(acc_[x], float(src1_[x]), s2);
  }

  // Masked blocks always select lane by lane: a branch on all-zero or
  // all-set masks costs more in mispredictions at region edges than it saves.
  template <StoreMode M>
  void block(int x) {
    __m128 keep[4] = {};
    if (kMasked) keepLanes(_mm_cmpeq_epi8(loadu(mask_ + x), _mm_setzero_si128()), keep);
    update<M, kMasked>(x, keep);
  }

  template <StoreMode M>
  void part(int x) {
    __m128 s1, s2;
    if constexpr (kExactProduct) {
      s1 = s2 = exactProducts(src1_ + x, second() + x);
    } else {
      s1 = ToFloat<Src>::part(src1_ + x);
      s2 = kSources == 2 ? ToFloat<Src>::part(src2_ + x) : s1;
    }
    store<M, kMasked>(x, s1, s2, kMasked ? keepLanes(mask_ + x) : s1);
  }

 private:
  // Not for products of two signed bytes: -3 x 0 is -0 in floating point,
  // and a + -0 differs from a + 0 when a is -0.
  static constexpr bool kExactProduct =
      Formula::kProduct && sizeof(Src) == 1 && (std::is_unsigned<Src>::value || kSources == 1);

  template <StoreMode M, bool kSelect>
  void update(int x, const __m128 keep[4]) {
    if (kSources == 2 || kMasked) {
      // With three or four streams to read, the hardware prefetchers alone
      // leave the memory idle between requests: ask ahead (no fault past the end).
      prefetch(acc_ + x + kPrefetchAhead);
      prefetch(src1_ + x + kPrefetchAhead);
      if (kSources == 2) prefetch(src2_ + x + kPrefetchAhead);
      if (kMasked) prefetch(mask_ + x + kPrefetchAhead);
    }
    __m128 s1[4], s2[4];
    if constexpr (kExactProduct) {
      exactProducts(src1_ + x, second() + x, s1);
    } else {
      ToFloat<Src>::block(src1_ + x, s1);
      if (kSources == 2) ToFloat<Src>::block(src2_ + x, s2);
    }
    for (int i = 0; i < 4; ++i)
      store<M, kSelect>(x + 4 * i, s1[i], kSources == 2 && !kExactProduct ? s2[i] : s1[i], keep[i]);
  }

  static constexpr int kPrefetchAhead = 256;  // pixels
  static void prefetch(const void* p) { _mm_prefetch(static_cast<const char*>(p), _MM_HINT_T0); }

  const Src* second() const { return kSources == 2 ? src2_ : src1_; }

  template <StoreMode M, bool kSelect>
  void store(int x, __m128 s1, __m128 s2, __m128 keep) {
    __m128 a = kInPlace ? _mm_load_ps(acc_ + x) : _mm_loadu_ps(acc_ + x);
    __m128 r = kExactProduct ? _mm_add_ps(a, s1) : f_(a, s1, s2);
    if (kSelect) r = select(keep, a, r);
    simd::put<M, simd::Vec<float>>(out_ + x, r);
  }

  const Src* src1_;
  const Src* src2_;
  const uint8_t* mask_;
  const float* acc_;
  float* out_;
  Formula f_;
};

// Images of one call. src2 and mask are unused (null) where the operation has
// none; acc is the accumulator read, out the image written.
template <typename Src>
struct Images {
  Plane<const Src> src1, src2;
  Plane<const uint8_t> mask;
  Plane<const float> acc;
  Plane<float> out;
};

template <int kSources, bool kMasked, bool kInPlace, typename Src, typename Formula>
void run(StoreMode mode, const Images<Src>& im, int width, int height, Formula f) {
  driveRows(mode, width, height, [&](int y) {
    return Row<Src, kSources, kMasked, kInPlace, Formula>(
        im.src1.row(y), kSources == 2 ? im.src2.row(y) : nullptr, kMasked ? im.mask.row(y) : nullptr,
        im.acc.row(y), im.out.row(y), f);
  });
}

}  // namespace accumulate
}  // namespace zelcv

#endif  // ZELCV_KERNELS_ACCUMULATE_H
