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

// The scalar form, and the vector form for any instruction set's vectors.
template <typename T> struct Ops {
  static T one(T a, T b) { return T(a > b ? a - b : b - a); }
  template <typename V>
  static typename V::Raw vec(typename V::Raw a, typename V::Raw b) {
    return V::bitOr(V::subs(a, b), V::subs(b, a));
  }
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
  template <typename V>
  static typename V::Raw vec(typename V::Raw a, typename V::Raw b) {
    return V::abs(V::sub(a, b));
  }
};

// One row: src2 is a second image, or null with the constant c used instead.
template <typename T, bool kConstant, typename Isa>
class Row {
  using V = simd::Vec<T, Isa>;
  using Part = simd::Vec<T>;  // 16 bytes whatever the block width

 public:
  // Four vectors per block, but two of 512 bits: 8-bit rows of a few hundred
  // bytes would otherwise leave much of each row to the 16-byte parts.
  static constexpr int kVectors = Isa::kBytes >= 64 ? 2 : 4;
  static constexpr int kPart = Part::kLanes;
  static constexpr int kBlock = kVectors * V::kLanes;
  static constexpr int kBlockAlign = Isa::kBytes;

  Row(const T* src1, const T* src2, T c, T* out) : src1_(src1), src2_(src2), c_(c), out_(out) {}

  const T* written() const { return out_; }

  void one(int x) { out_[x] = Ops<T>::one(src1_[x], kConstant ? c_ : src2_[x]); }

  template <StoreMode M>
  void block(int x) {
    // All loads first, so that the independent results overlap.
    typename V::Raw a[kVectors], b[kVectors];
    for (int i = 0; i < kVectors; ++i) {
      a[i] = V::loadu(src1_ + x + i * V::kLanes);
      b[i] = kConstant ? V::set1(c_) : V::loadu(src2_ + x + i * V::kLanes);
    }
    for (int i = 0; i < kVectors; ++i) simd::put<M, V>(out_ + x + i * V::kLanes, Ops<T>::template vec<V>(a[i], b[i]));
  }

  template <StoreMode M>
  void part(int x) {
    typename Part::Raw b = kConstant ? Part::set1(c_) : Part::loadu(src2_ + x);
    simd::put<M, Part>(out_ + x, Ops<T>::template vec<Part>(Part::loadu(src1_ + x), b));
  }

 private:
  const T* src1_;
  const T* src2_;
  T c_;
  T* out_;
};

// |src1 - src2| (src2.data non-null) or |src1 - c| over width x height.
template <typename T, typename Isa>
void run(StoreMode mode, Plane<const T> src1, Plane<const T> src2, T c, Plane<T> dst, int width, int height) {
  if (src2.data) {
    driveRows(mode, width, height,
              [&](int y) { return Row<T, false, Isa>(src1.row(y), src2.row(y), c, dst.row(y)); });
  } else {
    driveRows(mode, width, height,
              [&](int y) { return Row<T, true, Isa>(src1.row(y), nullptr, c, dst.row(y)); });
  }
}

#define ZELCV_ABSDIFF_RUN(T, Isa)                                                                         \
  void run<T, Isa>(StoreMode mode, Plane<const T> src1, Plane<const T> src2, T c, Plane<T> dst, int width, \
                   int height)
// Every instance on one instruction set, after `declare` (template, or
// extern template).
#define ZELCV_ABSDIFF_INSTANCES(declare, Isa) \
  declare ZELCV_ABSDIFF_RUN(uint8_t, Isa);    \
  declare ZELCV_ABSDIFF_RUN(uint16_t, Isa);   \
  declare ZELCV_ABSDIFF_RUN(float, Isa);
// Built in absdiff_avx2.cpp and absdiff_avx512.cpp.
ZELCV_ABSDIFF_INSTANCES(extern template, avx2::Isa)
ZELCV_ABSDIFF_INSTANCES(extern template, avx512::Isa)

}  // namespace absdiff
}  // namespace zelcv

#endif  // ZELCV_KERNELS_ABSDIFF_H
