// Kernels that update a 32f accumulator from one or two sources: a formula
// (written once over a vector type, so that single pixels, 128-bit parts and
// full-width blocks get the same single-precision operations in the same
// order) applied per pixel, optionally under an 8u mask.
//
// Blocks use the instruction set's full width through Kit<Isa>: the
// conversions of source elements to floats, exact 8-bit products and mask
// lanes. The 128-bit parts use Quad<Isa>. Both are templates over the
// instruction set even where the code is the same, so that an AVX2 or
// AVX-512 file's copies keep names of their own.
#ifndef ZELCV_KERNELS_ACCUMULATE_H
#define ZELCV_KERNELS_ACCUMULATE_H

#include <stdint.h>
#include <string.h>

#include <type_traits>

#include "kernels/row_driver.h"
#include "kernels/simd.h"

namespace zelcv {
namespace accumulate {

// Single floats with the operations of a vector type.
template <typename Isa> struct Scalar {
  using Raw = float;
  static float add(float a, float b) { return a + b; }
  static float sub(float a, float b) { return a - b; }
  static float mul(float a, float b) { return a * b; }
  static float set1(float v) { return v; }
};

// ---- 128-bit helpers --------------------------------------------------------

template <typename Isa> struct Sse {
  static __m128i loadu(const void* p) { return _mm_loadu_si128(static_cast<const __m128i*>(p)); }
  static __m128i load4(const void* p) {
    int32_t bits;
    memcpy(&bits, p, 4);
    return _mm_cvtsi32_si128(bits);
  }
  static __m128i load8(const void* p) { return _mm_loadl_epi64(static_cast<const __m128i*>(p)); }
  // The old bits where `keep` is set, the new value elsewhere.
  static __m128 select(__m128 keep, __m128 old, __m128 updated) {
    return _mm_or_ps(_mm_and_ps(keep, old), _mm_andnot_ps(keep, updated));
  }
  // 32-bit lanes of all ones for the mask bytes that are zero (pixels kept),
  // from four mask bytes in the low lanes of `zero` (0xFF where zero).
  static __m128 keepLow(__m128i zero) {
    zero = _mm_unpacklo_epi8(zero, zero);
    return _mm_castsi128_ps(_mm_unpacklo_epi16(zero, zero));
  }
};

// Widening of integer lanes: bytes to 16-bit lanes (lo16, hi16: the low and
// high eight of sixteen), and 16-bit lanes to floats (lo, hi: the low and
// high four of eight). All exact.
template <typename T, typename Isa> struct Widen {
  static __m128i lo16(__m128i v) { return _mm_unpacklo_epi8(v, _mm_setzero_si128()); }
  static __m128i hi16(__m128i v) { return _mm_unpackhi_epi8(v, _mm_setzero_si128()); }
  static __m128 lo(__m128i v) { return _mm_cvtepi32_ps(_mm_unpacklo_epi16(v, _mm_setzero_si128())); }
  static __m128 hi(__m128i v) { return _mm_cvtepi32_ps(_mm_unpackhi_epi16(v, _mm_setzero_si128())); }
};

// Sign extension: the value lands in the high half of a wider lane, then an
// arithmetic shift brings it down.
template <typename Isa> struct Widen<int8_t, Isa> {
  static __m128i lo16(__m128i v) { return _mm_srai_epi16(_mm_unpacklo_epi8(v, v), 8); }
  static __m128i hi16(__m128i v) { return _mm_srai_epi16(_mm_unpackhi_epi8(v, v), 8); }
  static __m128 lo(__m128i v) { return _mm_cvtepi32_ps(_mm_srai_epi32(_mm_unpacklo_epi16(v, v), 16)); }
  static __m128 hi(__m128i v) { return _mm_cvtepi32_ps(_mm_srai_epi32(_mm_unpackhi_epi16(v, v), 16)); }
};

// Four floats, named after the instruction set of the file that uses them.
template <typename Isa> struct QuadVec : simd::Vec<float> {};

// Four pixels as one vector: the vector parts of a row, whatever the
// instruction set of its blocks.
//
// exactProducts: products of 8-bit sources formed exactly in integer lanes.
// They stay below 2^24, so once converted they equal the single-precision
// product of the converted sources (signed zeros aside), at a fraction of the
// conversions.
template <typename Isa> struct Quad {
  using V = QuadVec<Isa>;
  using Keep = __m128;
  using S = Sse<Isa>;
  static constexpr int kVectors = 1;

  template <typename T>
  static void toFloat(const T* p, __m128 out[1]) {
    if constexpr (std::is_same<T, float>::value)
      out[0] = _mm_loadu_ps(p);
    else if constexpr (sizeof(T) == 2)
      out[0] = Widen<T, Isa>::lo(S::load8(p));
    else
      out[0] = Widen<T, Isa>::lo(Widen<T, Isa>::lo16(S::load4(p)));
  }
  template <typename T>
  static void exactProducts(const T* p1, const T* p2, __m128 out[1]) {
    using W = Widen<T, Isa>;
    out[0] = W::lo(_mm_mullo_epi16(W::lo16(S::load4(p1)), W::lo16(S::load4(p2))));
  }
  static void keepLanes(const uint8_t* mask, __m128 keep[1]) {
    keep[0] = S::keepLow(_mm_cmpeq_epi8(S::load4(mask), _mm_setzero_si128()));
  }
  static __m128 select(__m128 keep, __m128 old, __m128 updated) { return S::select(keep, old, updated); }
};

// What the mask of a block selects, from the bits of its zero mask bytes.
enum class Selection { None, Some, All };
template <typename Isa>
Selection selectionOf(uint64_t zeroBits, uint64_t allBits) {
  return zeroBits == allBits ? Selection::None : zeroBits == 0 ? Selection::All : Selection::Some;
}

// The full-width helpers: a block is kVectors vectors of V, and Keep says per
// lane of a vector whether the old value stays. The baseline's are here; the
// others in accumulate_avx2.cpp and accumulate_avx512.cpp.
template <typename Isa> struct Kit;

template <> struct Kit<simd::Sse2> {
  using Isa = simd::Sse2;
  using V = simd::Vec<float>;
  using Keep = __m128;
  using S = Sse<Isa>;
  static constexpr int kVectors = 4;

  // Sixteen 16-bit lanes (two vectors) as four float vectors.
  template <typename T>
  static void toFloats(__m128i low, __m128i high, __m128 out[4]) {
    out[0] = Widen<T, Isa>::lo(low);
    out[1] = Widen<T, Isa>::hi(low);
    out[2] = Widen<T, Isa>::lo(high);
    out[3] = Widen<T, Isa>::hi(high);
  }
  template <typename T>
  static void toFloat(const T* p, __m128 out[4]) {
    if constexpr (std::is_same<T, float>::value) {
      for (int i = 0; i < 4; ++i) out[i] = _mm_loadu_ps(p + 4 * i);
    } else if constexpr (sizeof(T) == 2) {
      toFloats<T>(S::loadu(p), S::loadu(p + 8), out);
    } else {
      __m128i v = S::loadu(p);
      toFloats<T>(Widen<T, Isa>::lo16(v), Widen<T, Isa>::hi16(v), out);
    }
  }
  template <typename T>
  static void exactProducts(const T* p1, const T* p2, __m128 out[4]) {
    using W = Widen<T, Isa>;
    __m128i a = S::loadu(p1), b = S::loadu(p2);
    toFloats<T>(_mm_mullo_epi16(W::lo16(a), W::lo16(b)), _mm_mullo_epi16(W::hi16(a), W::hi16(b)), out);
  }
  static void keepLanes(const uint8_t* mask, __m128 keep[4]) {
    __m128i zero = _mm_cmpeq_epi8(S::loadu(mask), _mm_setzero_si128());
    __m128i l = _mm_unpacklo_epi8(zero, zero), h = _mm_unpackhi_epi8(zero, zero);
    keep[0] = _mm_castsi128_ps(_mm_unpacklo_epi16(l, l));
    keep[1] = _mm_castsi128_ps(_mm_unpackhi_epi16(l, l));
    keep[2] = _mm_castsi128_ps(_mm_unpacklo_epi16(h, h));
    keep[3] = _mm_castsi128_ps(_mm_unpackhi_epi16(h, h));
  }
  static Selection selection(const uint8_t* mask) {
    const int zeros = _mm_movemask_epi8(_mm_cmpeq_epi8(S::loadu(mask), _mm_setzero_si128()));
    return selectionOf<Isa>(uint32_t(zeros), 0xFFFF);
  }
  static __m128 select(__m128 keep, __m128 old, __m128 updated) { return S::select(keep, old, updated); }
};

// ---- The formulas -------------------------------------------------------------

// a is the accumulator, s1 and s2 the converted sources (s2 = s1 with one
// source). kProduct: the formula is a + s1 x s2, so an exact product may be
// passed to the plain sum instead.
struct Add {
  static constexpr bool kProduct = false;
  template <typename V>
  typename V::Raw apply(typename V::Raw a, typename V::Raw s, typename V::Raw) const {
    return V::add(a, s);
  }
};
struct AddProduct {
  static constexpr bool kProduct = true;
  template <typename V>
  typename V::Raw apply(typename V::Raw a, typename V::Raw s1, typename V::Raw s2) const {
    return V::add(a, V::mul(s1, s2));
  }
};
// The square is the product of the source with itself.
struct AddSquare : AddProduct {};
// The running average as one subtraction, one product and one sum.
struct AddWeighted {
  static constexpr bool kProduct = false;
  float alpha;
  template <typename V>
  typename V::Raw apply(typename V::Raw a, typename V::Raw s, typename V::Raw) const {
    return V::add(V::mul(V::sub(s, a), V::set1(alpha)), a);
  }
};

// ---- Rows ---------------------------------------------------------------------

// One row of an update. With kInPlace the accumulator read is the one
// written (so its vector loads are aligned); otherwise it is a separate image.
template <typename Src, int kSources, bool kMasked, bool kInPlace, typename Formula, typename Isa>
class Row {
  using Block = Kit<Isa>;
  using Part = Quad<Isa>;

 public:
  static constexpr int kBlock = Block::kVectors * Block::V::kLanes;
  static constexpr int kPart = 4;
  static constexpr int kBlockAlign = Isa::kBytes;

  Row(const Src* src1, const Src* src2, const uint8_t* mask, const float* acc, float* out, const Formula& f)
      : src1_(src1), src2_(src2), mask_(mask), acc_(acc), out_(out), f_(f) {}

  const float* written() const { return out_; }

  void one(int x) {
    if (kMasked && !mask_[x]) return;
    float s1 = float(src1_[x]);
    out_[x] = f_.template apply<Scalar<Isa>>(acc_[x], s1, kSources == 2 ? float(src2_[x]) : s1);
  }

  // Masks mark regions, so most blocks are wholly unselected (skipped: their
  // sources need not be read nor their accumulator touched) or wholly
  // selected (updated without selecting); only blocks at region edges select
  // lane by lane. The skipped runs leave holes in every stream that the
  // hardware prefetchers follow poorly, so masked rows ask ahead themselves,
  // every line of each stream that a block spans (no fault past the end).
  // Rows without a mask run faster without.
  template <StoreMode M>
  void block(int x) {
    if constexpr (kMasked) {
      prefetch(acc_ + x);
      prefetch(src1_ + x);
      if (kSources == 2) prefetch(src2_ + x);
      prefetch(mask_ + x);
      const Selection selected = Block::selection(mask_ + x);
      if (selected == Selection::None) return;
      if (selected == Selection::All) return update<Block, M, false>(x);
    }
    update<Block, M, kMasked>(x);
  }

  template <StoreMode M>
  void part(int x) {
    update<Part, M, kMasked>(x);
  }

 private:
  // Not for products of two signed bytes: -3 x 0 is -0 in floating point,
  // and a + -0 differs from a + 0 when a is -0.
  static constexpr bool kExactProduct =
      Formula::kProduct && sizeof(Src) == 1 && (std::is_unsigned<Src>::value || kSources == 1);

  static constexpr int kPrefetchAhead = 256;  // pixels
  template <typename T>
  static void prefetch(const T* p) {
    for (int i = 0; i < kBlock; i += 64 / int(sizeof(T)))
      _mm_prefetch(reinterpret_cast<const char*>(p + kPrefetchAhead + i), _MM_HINT_T0);
  }

  const Src* second() const { return kSources == 2 ? src2_ : src1_; }

  // Kit::kVectors vectors from pixel x on.
  template <typename K, StoreMode M, bool kSelect>
  void update(int x) {
    using V = typename K::V;
    constexpr int n = K::kVectors;
    typename V::Raw s1[n], s2[n];
    typename K::Keep keep[n];
    if constexpr (kExactProduct) {
      K::exactProducts(src1_ + x, second() + x, s1);
    } else {
      K::toFloat(src1_ + x, s1);
      if (kSources == 2) K::toFloat(src2_ + x, s2);
    }
    if constexpr (kSelect) K::keepLanes(mask_ + x, keep);
    for (int i = 0; i < n; ++i) {
      const int at = x + i * V::kLanes;
      typename V::Raw a = kInPlace ? V::load(acc_ + at) : V::loadu(acc_ + at);
      typename V::Raw r;
      if constexpr (kExactProduct)
        r = V::add(a, s1[i]);
      else
        r = f_.template apply<V>(a, s1[i], kSources == 2 ? s2[i] : s1[i]);
      if constexpr (kSelect) r = K::select(keep[i], a, r);
      simd::put<M, V>(out_ + at, r);
    }
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

template <int kSources, bool kMasked, bool kInPlace, typename Src, typename Formula, typename Isa>
void run(StoreMode mode, const Images<Src>& im, int width, int height, Formula f) {
  driveRows(mode, width, height, [&](int y) {
    return Row<Src, kSources, kMasked, kInPlace, Formula, Isa>(
        im.src1.row(y), kSources == 2 ? im.src2.row(y) : nullptr, kMasked ? im.mask.row(y) : nullptr,
        im.acc.row(y), im.out.row(y), f);
  });
}

// Every instance that the exports run, as
// X(Isa, kSources, kMasked, kInPlace, Src, Formula).
#define ZELCV_ACCUMULATE_EACH_SOURCE_TYPE(X, Isa, kSources, kMasked, Formula) \
  X(Isa, kSources, kMasked, true, uint8_t, Formula)                          \
  X(Isa, kSources, kMasked, true, int8_t, Formula)                           \
  X(Isa, kSources, kMasked, true, uint16_t, Formula)                         \
  X(Isa, kSources, kMasked, true, float, Formula)
#define ZELCV_ACCUMULATE_INSTANCES(X, Isa)                             \
  ZELCV_ACCUMULATE_EACH_SOURCE_TYPE(X, Isa, 1, false, Add)             \
  ZELCV_ACCUMULATE_EACH_SOURCE_TYPE(X, Isa, 1, true, Add)              \
  ZELCV_ACCUMULATE_EACH_SOURCE_TYPE(X, Isa, 1, false, AddSquare)       \
  ZELCV_ACCUMULATE_EACH_SOURCE_TYPE(X, Isa, 1, true, AddSquare)        \
  ZELCV_ACCUMULATE_EACH_SOURCE_TYPE(X, Isa, 2, false, AddProduct)      \
  ZELCV_ACCUMULATE_EACH_SOURCE_TYPE(X, Isa, 2, true, AddProduct)       \
  ZELCV_ACCUMULATE_EACH_SOURCE_TYPE(X, Isa, 1, false, AddWeighted)     \
  ZELCV_ACCUMULATE_EACH_SOURCE_TYPE(X, Isa, 1, true, AddWeighted)      \
  X(Isa, 1, false, false, float, AddWeighted)

#define ZELCV_ACCUMULATE_RUN(Isa, kSources, kMasked, kInPlace, Src, Formula) \
  void run<kSources, kMasked, kInPlace, Src, Formula, Isa>(StoreMode, const Images<Src>&, int, int, Formula);
#define ZELCV_ACCUMULATE_EXTERN(...) extern template ZELCV_ACCUMULATE_RUN(__VA_ARGS__)
// Built in accumulate_avx2.cpp and accumulate_avx512.cpp.
ZELCV_ACCUMULATE_INSTANCES(ZELCV_ACCUMULATE_EXTERN, avx2::Isa)
ZELCV_ACCUMULATE_INSTANCES(ZELCV_ACCUMULATE_EXTERN, avx512::Isa)

}  // namespace accumulate
}  // namespace zelcv

#endif  // ZELCV_KERNELS_ACCUMULATE_H
