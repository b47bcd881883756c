// Absolute differences of two images, or of an image and a constant, for
// 8u, 16u and 32f. Integer results are exact; 32f results are the single-
// precision difference with its sign bit cleared.
#ifndef ZELCV_KERNELS_ABSDIFF_H
#define ZELCV_KERNELS_ABSDIFF_H

#include <stdint.h>
#include <string.h>

#include "kernels/row_driver.h"
#include "kernels/simd.h"

namespace zelcv {
namespace absdiff {

template <typename T> struct Ops;

template <> struct Ops<uint8_t> {
  static uint8_t one(uint8_t a, uint8_t b) { return uint8_t(a > b ? a - b : b - a); }
  static __m128i vec(__m128i a, __m128i b) { return _mm_or_si128(_mm_subs_epu8(a, b), _mm_subs_epu8(b, a)); }
};

template <> struct Ops<uint16_t> {
  static uint16_t one(uint16_t a, uint16_t b) { return uint16_t(a > b ? a - b : b - a); }
  static __m128i vec(__m128i a, __m128i b) { return _mm_or_si128(_mm_subs_epu16(a, b), _mm_subs_epu16(b, a)); }
};

template <> struct Ops<float> {
  static float one(float a, float b) {
    float d = a - b;
    uint32_t bits;
    memcpy(&bits, &d, 4);
    bits &= 0x7FFFFFFFu;
    memcpy(&d, &bits, 4);
    return d;
  }
  static __m128 vec(__m128 a, __m128 b) { return _mm_andnot_ps(_mm_set1_ps(-0.0f), _mm_sub_ps(a, b)); }
};

// One row: src2 is a second image, or null with the constant c used instead.
template <typename T, bool kConstant>
class Row {
  using V = simd::Vec<T>;

 public:
  static constexpr int kPart = simd::kBytes / int(sizeof(T));  // one vector
  static constexpr int kBlock = 4 * kPart;

  Row(const T* src1, const T* src2, T c, T* out) : src1_(src1), src2_(src2), c_(c), out_(out) {}

  const T* written() const { return out_; }

  void one(int x) { out_[x] = Ops<T>::one(src1_[x], kConstant ? c_ : src2_[x]); }

  template <StoreMode M>
  void block(int x) {
    // All loads first, so that the four independent results overlap.
    typename V::Raw a[4], b[4];
    for (int i = 0; i < 4; ++i) {
      a[i] = V::loadu(src1_ + x + i * kPart);
      b[i] = kConstant ? V::set1(c_) : V::loadu(src2_ + x + i * kPart);
    }
    for (int i = 0; i < 4; ++i) simd::put<M, V>(out_ + x + i * kPart, Ops<T>::vec(a[i], b[i]));
  }

  template <StoreMode M>
  void part(int x) {
    typename V::Raw b = kConstant ? V::set1(c_) : V::loadu(src2_ + x);
    simd::put<M, V>(out_ + x, Ops<T>::vec(V::loadu(src1_ + x), b));
  }

 private:
  const T* src1_;
  const T* src2_;
  T c_;
  T* out_;
};

// |src1 - src2| (src2.data non-null) or |src1 - c| over width x height.
template <typename T>
void run(StoreMode mode, Plane<const T> src1, Plane<const T> src2, T c, Plane<T> dst, int width, int height) {
  if (src2.data) {
    driveRows(mode, width, height,
              [&](int y) { return Row<T, false>(src1.row(y), src2.row(y), c, dst.row(y)); });
  } else {
    driveRows(mode, width, height, [&](int y) { return Row<T, true>(src1.row(y), nullptr, c, dst.row(y)); });
  }
}

}  // namespace absdiff
}  // namespace zelcv

#endif  // ZELCV_KERNELS_ABSDIFF_H
