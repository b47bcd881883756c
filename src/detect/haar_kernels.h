// Haar classifier evaluation: the scalar window evaluation (the definition of
// the results) and the vector form, which evaluates Ops::kLanes neighbouring
// windows at once and gives the same bits. Neighbouring windows read
// neighbouring integral elements, so every corner of a rectangle is one
// unaligned vector load.
//
// Everything here has internal linkage: each file that includes it (the SSE2
// and the AVX2 one) keeps its own copy compiled for its instruction set.
#ifndef ZELCV_DETECT_HAAR_KERNELS_H
#define ZELCV_DETECT_HAAR_KERNELS_H

#include <emmintrin.h>
#include <stddef.h>
#include <stdint.h>
#include <string.h>

#include "detect/haar_apply.h"
#include "detect/haar_classifier.h"
#include "kernels/simd.h"

namespace zelcv {
namespace haar {
namespace {

// The corner offsets of a rectangle in elements, ordered so that its sum is
// (p[o[3]] - p[o[2]]) - (p[o[1]] - p[o[0]]) for both kinds.
inline void cornerOffsets(const Rect& r, bool tilted, ptrdiff_t stride, ptrdiff_t o[4]) {
  if (!tilted) {
    o[0] = ptrdiff_t(r.y) * stride + r.x;
    o[1] = o[0] + r.width;
    o[2] = ptrdiff_t(r.y + r.height) * stride + r.x;
    o[3] = o[2] + r.width;
  } else {
    o[0] = ptrdiff_t(r.y) * stride + r.x;                                             // top
    o[1] = ptrdiff_t(r.y + r.width) * stride + r.x + r.width;                         // right
    o[2] = ptrdiff_t(r.y + r.height) * stride + r.x - r.height;                       // left
    o[3] = ptrdiff_t(r.y + r.width + r.height) * stride + r.x + r.width - r.height;  // bottom
  }
}

// ---- Scalar ----------------------------------------------------------------

inline float featureValue(const Classifier& c, const Feature& f, const float* p, ptrdiff_t stride) {
  float value = 0.0f;
  for (int r = 0; r < f.rectCount; ++r) {
    const Rect& rect = c.rects[f.firstRect + r];
    ptrdiff_t o[4];
    cornerOffsets(rect, f.tilted != 0, stride, o);
    const float s = (simd::loadOne(p + o[3]) - simd::loadOne(p + o[2])) -
                    (simd::loadOne(p + o[1]) - simd::loadOne(p + o[0]));
    const float product = rect.weight.f * s;
    value = r == 0 ? product : value + product;
  }
  return value;
}

inline float featureValue(const Classifier& c, const Feature& f, const int32_t* p, ptrdiff_t stride) {
  uint32_t value = 0;  // wraps modulo 2^32
  for (int r = 0; r < f.rectCount; ++r) {
    const Rect& rect = c.rects[f.firstRect + r];
    ptrdiff_t o[4];
    cornerOffsets(rect, f.tilted != 0, stride, o);
    const uint32_t s = (uint32_t(simd::loadOne(p + o[3])) - uint32_t(simd::loadOne(p + o[2]))) -
                       (uint32_t(simd::loadOne(p + o[1])) - uint32_t(simd::loadOne(p + o[0])));
    value += uint32_t(rect.weight.i) * s;
  }
  return float(int32_t(value));
}

// The stage's decision for the window whose origin is at src (and tilt).
template <typename Elem>
inline bool windowAccepted(const Classifier& c, const Elem* src, ptrdiff_t srcStride, const Elem* tilt,
                           ptrdiff_t tiltStride, float nv, float threshold) {
  float sum = 0.0f;
  for (int k = 0; k < c.featureCount; ++k) {
    const Feature& f = c.features[k];
    const float v = f.tilted ? featureValue(c, f, tilt, tiltStride) : featureValue(c, f, src, srcStride);
    sum = sum + (v < f.threshold * nv ? f.below : f.above);
  }
  return !(sum < threshold);
}

// ---- Vector ----------------------------------------------------------------

template <class Ops>
inline typename Ops::F featureVector(const Classifier& c, const Feature& f, const float* p, ptrdiff_t stride) {
  typename Ops::F value = Ops::zero();
  for (int r = 0; r < f.rectCount; ++r) {
    const Rect& rect = c.rects[f.firstRect + r];
    ptrdiff_t o[4];
    cornerOffsets(rect, f.tilted != 0, stride, o);
    const typename Ops::F s = Ops::sub(Ops::sub(Ops::loadF(p + o[3]), Ops::loadF(p + o[2])),
                                       Ops::sub(Ops::loadF(p + o[1]), Ops::loadF(p + o[0])));
    const typename Ops::F product = Ops::mul(Ops::set1(rect.weight.f), s);
    value = r == 0 ? product : Ops::add(value, product);
  }
  return value;
}

template <class Ops>
inline typename Ops::F featureVector(const Classifier& c, const Feature& f, const int32_t* p, ptrdiff_t stride) {
  typename Ops::I value = Ops::zeroI();
  for (int r = 0; r < f.rectCount; ++r) {
    const Rect& rect = c.rects[f.firstRect + r];
    ptrdiff_t o[4];
    cornerOffsets(rect, f.tilted != 0, stride, o);
    const typename Ops::I s = Ops::subI(Ops::subI(Ops::loadI(p + o[3]), Ops::loadI(p + o[2])),
                                        Ops::subI(Ops::loadI(p + o[1]), Ops::loadI(p + o[0])));
    value = Ops::addI(value, Ops::mulI(s, rect.weight.i));
  }
  return Ops::toFloat(value);
}

// Bit j set where window j of the group is rejected.
template <class Ops, typename Elem>
inline int rejectedLanes(const Classifier& c, const Elem* src, ptrdiff_t srcStride, const Elem* tilt,
                         ptrdiff_t tiltStride, const float* norm, float threshold) {
  const typename Ops::F nv = Ops::loadF(norm);
  typename Ops::F sum = Ops::zero();
  for (int k = 0; k < c.featureCount; ++k) {
    const Feature& f = c.features[k];
    const typename Ops::F v =
        f.tilted ? featureVector<Ops>(c, f, tilt, tiltStride) : featureVector<Ops>(c, f, src, srcStride);
    const typename Ops::F below = Ops::lessThan(v, Ops::mul(Ops::set1(f.threshold), nv));
    sum = Ops::add(sum, Ops::select(below, Ops::set1(f.below), Ops::set1(f.above)));
  }
  return Ops::signs(Ops::lessThan(sum, Ops::set1(threshold)));
}

inline bool sixteenZero(const uint8_t* m) {
  const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(m));
  return _mm_movemask_epi8(_mm_cmpeq_epi8(v, _mm_setzero_si128())) == 0xFFFF;
}

// Applies the stage to every row; returns the number of non-zero mask bytes
// afterwards. A group with a single live window is evaluated as one window.
template <class Ops, typename Elem>
int64_t applyRows(const ApplyArgs& a) {
  constexpr int kLanes = Ops::kLanes;
  const Classifier& c = *a.classifier;
  const Elem* src = static_cast<const Elem*>(a.src);
  const Elem* tilt = static_cast<const Elem*>(a.tilt);
  int64_t count = 0;
  for (int y = 0; y < a.height; ++y) {
    const Elem* srow = src + ptrdiff_t(y) * a.srcStride;
    const Elem* trow = tilt + ptrdiff_t(y) * a.tiltStride;
    const float* nrow = reinterpret_cast<const float*>(reinterpret_cast<const uint8_t*>(a.norm) +
                                                       ptrdiff_t(y) * a.normStep);
    uint8_t* m = a.mask + ptrdiff_t(y) * a.maskStep;
    int x = 0;
    while (x < a.width) {
      if (x + 16 <= a.width && sixteenZero(m + x)) {
        x += 16;
        continue;
      }
      if (x + kLanes <= a.width) {
        int live = 0;
        for (int j = 0; j < kLanes; ++j) live |= (m[x + j] != 0) << j;
        if (live & (live - 1)) {
          const int rejected =
              rejectedLanes<Ops>(c, srow + x, a.srcStride, trow + x, a.tiltStride, nrow + x, a.threshold);
          for (int j = 0; j < kLanes; ++j) {
            if (!(live >> j & 1)) continue;
            if (rejected >> j & 1)
              m[x + j] = 0;
            else
              ++count;
          }
          x += kLanes;
          continue;
        }
        if (!live) {
          x += kLanes;
          continue;
        }
        // One live window: evaluate it alone, then step past the group.
        const int j = __builtin_ctz(unsigned(live));
        if (windowAccepted(c, srow + x + j, a.srcStride, trow + x + j, a.tiltStride,
                           simd::loadOne(nrow + x + j), a.threshold))
          ++count;
        else
          m[x + j] = 0;
        x += kLanes;
        continue;
      }
      if (m[x]) {
        if (windowAccepted(c, srow + x, a.srcStride, trow + x, a.tiltStride, simd::loadOne(nrow + x), a.threshold))
          ++count;
        else
          m[x] = 0;
      }
      ++x;
    }
  }
  return count;
}

// ---- SSE2 ------------------------------------------------------------------

struct Sse2Ops {
  static constexpr int kLanes = 4;
  using F = __m128;
  using I = __m128i;
  static F zero() { return _mm_setzero_ps(); }
  static I zeroI() { return _mm_setzero_si128(); }
  static F loadF(const float* p) { return _mm_loadu_ps(p); }
  static I loadI(const int32_t* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
  static F set1(float v) { return _mm_set1_ps(v); }
  static F add(F a, F b) { return _mm_add_ps(a, b); }
  static F sub(F a, F b) { return _mm_sub_ps(a, b); }
  static F mul(F a, F b) { return _mm_mul_ps(a, b); }
  static I addI(I a, I b) { return _mm_add_epi32(a, b); }
  static I subI(I a, I b) { return _mm_sub_epi32(a, b); }
  // Low 32 bits of each product: SSE2 multiplies the even and the odd lanes
  // separately.
  static I mulI(I a, int32_t w) {
    const __m128i b = _mm_set1_epi32(w);
    const __m128i even = _mm_mul_epu32(a, b);
    const __m128i odd = _mm_mul_epu32(_mm_srli_epi64(a, 32), b);
    return _mm_unpacklo_epi32(_mm_shuffle_epi32(even, _MM_SHUFFLE(0, 0, 2, 0)),
                              _mm_shuffle_epi32(odd, _MM_SHUFFLE(0, 0, 2, 0)));
  }
  static F toFloat(I a) { return _mm_cvtepi32_ps(a); }
  static F lessThan(F a, F b) { return _mm_cmplt_ps(a, b); }
  static F select(F m, F a, F b) { return _mm_or_ps(_mm_and_ps(m, a), _mm_andnot_ps(m, b)); }
  static int signs(F m) { return _mm_movemask_ps(m); }
};

}  // namespace
}  // namespace haar
}  // namespace zelcv

#endif  // ZELCV_DETECT_HAAR_KERNELS_H
