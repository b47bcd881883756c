// Lens undistortion kernels: the camera model evaluated along a row, and
// bilinear resampling of a row through its source coordinates. Positions are
// quantised to 1/32 pixel and the four weights are small integers, so the 8u
// result is exact integer arithmetic and the 32f weights are exact floats;
// the vector paths give the same bits as the scalar ones.
#ifndef ZELCV_FILTER_UNDISTORT_KERNELS_H
#define ZELCV_FILTER_UNDISTORT_KERNELS_H

#include <emmintrin.h>
#include <stddef.h>
#include <stdint.h>
#include <string.h>

#include <type_traits>

#include "kernels/simd.h"

namespace zelcv {
namespace undistort {

constexpr int kSubBits = 5;                // 1/32 pixel
constexpr int kSubMask = (1 << kSubBits) - 1;
constexpr int kOne = 1 << kSubBits;        // 32
constexpr int kWeightShift = 2 * kSubBits; // the four weights sum to 1024

struct CameraModel {
  float fx, fy, cx, cy, k1, k2, p1, p2;
  float ifx, ify;  // 1 / fx and 1 / fy, rounded once
};

inline CameraModel makeModel(float fx, float fy, float cx, float cy, float k1, float k2, float p1, float p2) {
  return {fx, fy, cx, cy, k1, k2, p1, p2, 1.0f / fx, 1.0f / fy};
}

// The source position of the ideal point (jf, y) of a row whose normalised
// ordinate is y (y2 = y * y). The operation order is part of the contract.
inline void mapPoint(const CameraModel& m, float jf, float y, float y2, float& u, float& v) {
  const float x = (jf - m.cx) * m.ifx;
  const float x2 = x * x;
  const float r2 = x2 + y2;
  const float t = (x * y) * 2.0f;
  const float kr = (m.k2 * r2 + m.k1) * r2 + 1.0f;
  const float xd = x * kr + (m.p1 * t + m.p2 * (r2 + (x2 + x2)));
  const float yd = y * kr + (m.p1 * (r2 + (y2 + y2)) + m.p2 * t);
  u = xd * m.fx + m.cx;
  v = yd * m.fy + m.cy;
}

// Row i of both maps, `width` pixels; the outputs may have any alignment.
inline void mapRow(const CameraModel& m, int i, int width, float* uOut, float* vOut) {
  const float y = (float(i) - m.cy) * m.ify;
  const float y2 = y * y;
  int j = 0;
  const __m128 cx = _mm_set1_ps(m.cx), ifx = _mm_set1_ps(m.ifx), fx = _mm_set1_ps(m.fx);
  const __m128 cy = _mm_set1_ps(m.cy), fy = _mm_set1_ps(m.fy);
  const __m128 k1 = _mm_set1_ps(m.k1), k2 = _mm_set1_ps(m.k2), p1 = _mm_set1_ps(m.p1), p2 = _mm_set1_ps(m.p2);
  const __m128 yv = _mm_set1_ps(y), y2v = _mm_set1_ps(y2), one = _mm_set1_ps(1.0f);
  const __m128 ry2 = _mm_set1_ps(y2 + y2);
  __m128i jv = _mm_setr_epi32(0, 1, 2, 3);
  const __m128i four = _mm_set1_epi32(4);
  for (; j <= width - 4; j += 4, jv = _mm_add_epi32(jv, four)) {
    const __m128 x = _mm_mul_ps(_mm_sub_ps(_mm_cvtepi32_ps(jv), cx), ifx);
    const __m128 x2 = _mm_mul_ps(x, x);
    const __m128 r2 = _mm_add_ps(x2, y2v);
    const __m128 xy = _mm_mul_ps(x, yv);
    const __m128 t = _mm_add_ps(xy, xy);
    const __m128 kr = _mm_add_ps(_mm_mul_ps(_mm_add_ps(_mm_mul_ps(k2, r2), k1), r2), one);
    const __m128 xd = _mm_add_ps(
        _mm_mul_ps(x, kr), _mm_add_ps(_mm_mul_ps(p1, t), _mm_mul_ps(p2, _mm_add_ps(r2, _mm_add_ps(x2, x2)))));
    const __m128 yd =
        _mm_add_ps(_mm_mul_ps(yv, kr), _mm_add_ps(_mm_mul_ps(p1, _mm_add_ps(r2, ry2)), _mm_mul_ps(p2, t)));
    _mm_storeu_ps(uOut + j, _mm_add_ps(_mm_mul_ps(xd, fx), cx));
    _mm_storeu_ps(vOut + j, _mm_add_ps(_mm_mul_ps(yd, fy), cy));
  }
  for (; j < width; ++j) {
    float u, v;
    mapPoint(m, float(j), y, y2, u, v);
    simd::storeOne(uOut + j, u);
    simd::storeOne(vOut + j, v);
  }
}

// rint(u * 32) as the conversion instruction gives it: ties to even, and
// INT_MIN for NaN and out-of-range values (which then lie outside any image).
inline int32_t quantise(float u) { return _mm_cvtss_si32(_mm_set_ss(u * float(kOne))); }

// A source image as the sampler sees it.
template <typename T>
struct Source {
  const T* data;
  int step;
  int width, height;
  const T* row(int y) const {
    return reinterpret_cast<const T*>(reinterpret_cast<const char*>(data) + ptrdiff_t(step) * y);
  }
};

// One destination pixel from its quantised position; neighbours outside the
// source read 0.
template <typename T, int C>
inline void samplePixel(const Source<T>& s, int32_t X, int32_t Y, T* out) {
  const int ix = X >> kSubBits, iy = Y >> kSubBits;
  const int fx = X & kSubMask, fy = Y & kSubMask;
  const int w[4] = {(kOne - fx) * (kOne - fy), fx * (kOne - fy), (kOne - fx) * fy, fx * fy};
  const T* rows[2] = {iy >= 0 && iy < s.height ? s.row(iy) : nullptr,
                      iy + 1 >= 0 && iy + 1 < s.height ? s.row(iy + 1) : nullptr};
  const bool cols[2] = {ix >= 0 && ix < s.width, ix + 1 >= 0 && ix + 1 < s.width};
  for (int c = 0; c < C; ++c) {
    T p[4];
    for (int k = 0; k < 4; ++k) {
      const T* r = rows[k >> 1];
      p[k] = r && cols[k & 1] ? simd::loadOne(r + (ix + (k & 1)) * C + c) : T(0);
    }
    if constexpr (std::is_same<T, float>::value) {
      const float scale = 1.0f / float(1 << kWeightShift);
      const float v = ((p[0] * (float(w[0]) * scale) + p[1] * (float(w[1]) * scale)) + p[2] * (float(w[2]) * scale)) +
                      p[3] * (float(w[3]) * scale);
      simd::storeOne(out + c, v);
    } else {
      const int sum = w[0] * p[0] + w[1] * p[1] + w[2] * p[2] + w[3] * p[3];
      out[c] = T((sum + (1 << (kWeightShift - 1))) >> kWeightShift);
    }
  }
}

// Four pixels at once: their quantised positions, integer parts, fractions
// and the four weights as 32-bit lanes.
struct Quad {
  __m128i X, Y, ix, iy, w00, w01, w10, w11;
};

inline Quad makeQuad(const float* mx, const float* my) {
  Quad q;
  const __m128 k = _mm_set1_ps(float(kOne));
  q.X = _mm_cvtps_epi32(_mm_mul_ps(_mm_loadu_ps(mx), k));
  q.Y = _mm_cvtps_epi32(_mm_mul_ps(_mm_loadu_ps(my), k));
  q.ix = _mm_srai_epi32(q.X, kSubBits);
  q.iy = _mm_srai_epi32(q.Y, kSubBits);
  const __m128i mask = _mm_set1_epi32(kSubMask), one = _mm_set1_epi32(kOne);
  const __m128i fx = _mm_and_si128(q.X, mask), fy = _mm_and_si128(q.Y, mask);
  const __m128i gx = _mm_sub_epi32(one, fx), gy = _mm_sub_epi32(one, fy);
  // Factors up to 32 sit in the low halves of the lanes: a 16-bit multiply
  // gives the whole 32-bit product.
  q.w00 = _mm_mullo_epi16(gx, gy);
  q.w01 = _mm_mullo_epi16(fx, gy);
  q.w10 = _mm_mullo_epi16(gx, fy);
  q.w11 = _mm_mullo_epi16(fx, fy);
  return q;
}

// True when every lane's 2x2 neighbourhood lies inside the source with
// `margin` - 2 further pixels to the right of it (wide loads read them).
inline bool quadInside(const Quad& q, int xLimit, int yLimit) {
  const __m128i minus1 = _mm_set1_epi32(-1);
  const __m128i in = _mm_and_si128(
      _mm_and_si128(_mm_cmpgt_epi32(q.ix, minus1), _mm_cmplt_epi32(q.ix, _mm_set1_epi32(xLimit))),
      _mm_and_si128(_mm_cmpgt_epi32(q.iy, minus1), _mm_cmplt_epi32(q.iy, _mm_set1_epi32(yLimit))));
  return _mm_movemask_ps(_mm_castsi128_ps(in)) == 0xF;
}

inline __m128 weightsF(__m128i w) { return _mm_mul_ps(_mm_cvtepi32_ps(w), _mm_set1_ps(1.0f / float(1 << kWeightShift))); }

template <typename T, int C>
struct QuadKernel;

template <>
struct QuadKernel<uint8_t, 1> {
  static constexpr int kMargin = 2;  // reads ix, ix + 1
  static void run(const Source<uint8_t>& s, const Quad& q, uint8_t* out) {
    alignas(16) int32_t ix[4], iy[4];
    _mm_store_si128(reinterpret_cast<__m128i*>(ix), q.ix);
    _mm_store_si128(reinterpret_cast<__m128i*>(iy), q.iy);
    uint16_t t[4], b[4];
    for (int k = 0; k < 4; ++k) {
      const uint8_t* p = s.row(iy[k]) + ix[k];
      memcpy(&t[k], p, 2);
      memcpy(&b[k], p + s.step, 2);
    }
    const __m128i v = _mm_setr_epi16(short(t[0]), short(t[1]), short(t[2]), short(t[3]), short(b[0]), short(b[1]), short(b[2]),
                       short(b[3]));
    const __m128i zero = _mm_setzero_si128();
    const __m128i top = _mm_unpacklo_epi8(v, zero), bottom = _mm_unpackhi_epi8(v, zero);
    const __m128i wt = _mm_or_si128(q.w00, _mm_slli_epi32(q.w01, 16));
    const __m128i wb = _mm_or_si128(q.w10, _mm_slli_epi32(q.w11, 16));
    __m128i sum = _mm_add_epi32(_mm_madd_epi16(top, wt), _mm_madd_epi16(bottom, wb));
    sum = _mm_srli_epi32(_mm_add_epi32(sum, _mm_set1_epi32(1 << (kWeightShift - 1))), kWeightShift);
    const __m128i packed = _mm_packus_epi16(_mm_packs_epi32(sum, sum), zero);
    simd::storeOne(reinterpret_cast<int32_t*>(out), _mm_cvtsi128_si32(packed));
  }
};

template <>
struct QuadKernel<float, 1> {
  static constexpr int kMargin = 2;
  static void run(const Source<float>& s, const Quad& q, float* out) {
    alignas(16) int32_t ix[4], iy[4];
    _mm_store_si128(reinterpret_cast<__m128i*>(ix), q.ix);
    _mm_store_si128(reinterpret_cast<__m128i*>(iy), q.iy);
    __m128 t[2], b[2];
    for (int h = 0; h < 2; ++h) {
      const float* p0 = s.row(iy[2 * h]) + ix[2 * h];
      const float* p1 = s.row(iy[2 * h + 1]) + ix[2 * h + 1];
      const ptrdiff_t down = s.step;
      auto below = [down](const float* p) {
        return reinterpret_cast<const __m64*>(reinterpret_cast<const char*>(p) + down);
      };
      t[h] = _mm_loadh_pi(_mm_loadl_pi(_mm_setzero_ps(), reinterpret_cast<const __m64*>(p0)),
                          reinterpret_cast<const __m64*>(p1));
      b[h] = _mm_loadh_pi(_mm_loadl_pi(_mm_setzero_ps(), below(p0)), below(p1));
    }
    const __m128 p00 = _mm_shuffle_ps(t[0], t[1], _MM_SHUFFLE(2, 0, 2, 0));
    const __m128 p01 = _mm_shuffle_ps(t[0], t[1], _MM_SHUFFLE(3, 1, 3, 1));
    const __m128 p10 = _mm_shuffle_ps(b[0], b[1], _MM_SHUFFLE(2, 0, 2, 0));
    const __m128 p11 = _mm_shuffle_ps(b[0], b[1], _MM_SHUFFLE(3, 1, 3, 1));
    const __m128 r = _mm_add_ps(_mm_add_ps(_mm_add_ps(_mm_mul_ps(p00, weightsF(q.w00)), _mm_mul_ps(p01, weightsF(q.w01))),
                                           _mm_mul_ps(p10, weightsF(q.w10))),
                                _mm_mul_ps(p11, weightsF(q.w11)));
    _mm_storeu_ps(out, r);
  }
};

template <>
struct QuadKernel<uint8_t, 3> {
  static constexpr int kMargin = 3;  // an 8-byte load at pixel ix reaches into ix + 2
  static __m128i pairs(const uint8_t* p) {
    // [a0 a1 a2 b0 b1 b2 ..] -> 16-bit pairs (a0 b0) (a1 b1) (a2 b2)
    const __m128i v = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(p));
    return _mm_unpacklo_epi8(_mm_unpacklo_epi8(v, _mm_srli_si128(v, 3)), _mm_setzero_si128());
  }
  static void run(const Source<uint8_t>& s, const Quad& q, uint8_t* out) {
    alignas(16) int32_t ix[4], iy[4];
    _mm_store_si128(reinterpret_cast<__m128i*>(ix), q.ix);
    _mm_store_si128(reinterpret_cast<__m128i*>(iy), q.iy);
    const __m128i wt = _mm_or_si128(q.w00, _mm_slli_epi32(q.w01, 16));
    const __m128i wb = _mm_or_si128(q.w10, _mm_slli_epi32(q.w11, 16));
    const __m128i round = _mm_set1_epi32(1 << (kWeightShift - 1));
    __m128i r[4];
    for (int k = 0; k < 4; ++k) {
      const uint8_t* p = s.row(iy[k]) + 3 * ix[k];
      __m128i wtl, wbl;
      switch (k) {
        case 0: wtl = _mm_shuffle_epi32(wt, 0x00); wbl = _mm_shuffle_epi32(wb, 0x00); break;
        case 1: wtl = _mm_shuffle_epi32(wt, 0x55); wbl = _mm_shuffle_epi32(wb, 0x55); break;
        case 2: wtl = _mm_shuffle_epi32(wt, 0xAA); wbl = _mm_shuffle_epi32(wb, 0xAA); break;
        default: wtl = _mm_shuffle_epi32(wt, 0xFF); wbl = _mm_shuffle_epi32(wb, 0xFF); break;
      }
      const __m128i sum = _mm_add_epi32(_mm_madd_epi16(pairs(p), wtl), _mm_madd_epi16(pairs(p + s.step), wbl));
      r[k] = _mm_srli_epi32(_mm_add_epi32(sum, round), kWeightShift);
    }
    // Pixel k sits in bytes 4k .. 4k + 2 (byte 4k + 3 is left over): close
    // the gaps inside each 64-bit half, then between the halves, and store
    // 12 bytes.
    const __m128i packed = _mm_packus_epi16(_mm_packs_epi32(r[0], r[1]), _mm_packs_epi32(r[2], r[3]));
    const __m128i even = _mm_set_epi32(0, 0x00FFFFFF, 0, 0x00FFFFFF), odd = _mm_slli_epi64(even, 32);
    const __m128i halves =
        _mm_or_si128(_mm_and_si128(packed, even), _mm_srli_epi64(_mm_and_si128(packed, odd), 8));
    const __m128i lowHalf = _mm_set_epi32(0, 0, -1, -1);
    const __m128i joined =
        _mm_or_si128(_mm_and_si128(halves, lowHalf), _mm_srli_si128(_mm_andnot_si128(lowHalf, halves), 2));
    _mm_storel_epi64(reinterpret_cast<__m128i*>(out), joined);
    simd::storeOne(reinterpret_cast<int32_t*>(out + 8), _mm_cvtsi128_si32(_mm_srli_si128(joined, 8)));
  }
};

template <>
struct QuadKernel<float, 3> {
  static constexpr int kMargin = 3;  // a 4-float load at pixel ix + 1 reaches into ix + 2
  template <int k>
  static __m128 lane(__m128 v) {
    return _mm_shuffle_ps(v, v, k * 0x55);
  }
  template <int k>
  static void pixel(const Source<float>& s, const int32_t* ix, const int32_t* iy, __m128 w00, __m128 w01,
                    __m128 w10, __m128 w11, float* out) {
    const float* p = s.row(iy[k]) + 3 * ix[k];
    const float* d = reinterpret_cast<const float*>(reinterpret_cast<const char*>(p) + s.step);
    const __m128 r = _mm_add_ps(
        _mm_add_ps(_mm_add_ps(_mm_mul_ps(_mm_loadu_ps(p), lane<k>(w00)), _mm_mul_ps(_mm_loadu_ps(p + 3), lane<k>(w01))),
                   _mm_mul_ps(_mm_loadu_ps(d), lane<k>(w10))),
        _mm_mul_ps(_mm_loadu_ps(d + 3), lane<k>(w11)));
    _mm_storel_pi(reinterpret_cast<__m64*>(out + 3 * k), r);
    simd::storeOne(out + 3 * k + 2, _mm_cvtss_f32(_mm_movehl_ps(r, r)));
  }
  static void run(const Source<float>& s, const Quad& q, float* out) {
    alignas(16) int32_t ix[4], iy[4];
    _mm_store_si128(reinterpret_cast<__m128i*>(ix), q.ix);
    _mm_store_si128(reinterpret_cast<__m128i*>(iy), q.iy);
    const __m128 w00 = weightsF(q.w00), w01 = weightsF(q.w01), w10 = weightsF(q.w10), w11 = weightsF(q.w11);
    pixel<0>(s, ix, iy, w00, w01, w10, w11, out);
    pixel<1>(s, ix, iy, w00, w01, w10, w11, out);
    pixel<2>(s, ix, iy, w00, w01, w10, w11, out);
    pixel<3>(s, ix, iy, w00, w01, w10, w11, out);
  }
};

// Four destination pixels: the vector kernel when their neighbourhoods lie
// inside the source, else the scalar one.
template <typename T, int C>
inline void remapQuad(const Source<T>& s, const float* mx, const float* my, T* dst) {
  using K = QuadKernel<T, C>;
  const int xLimit = s.width - K::kMargin + 1;  // ix < xLimit
  const int yLimit = s.height - 1;              // iy < yLimit
  const Quad q = makeQuad(mx, my);
  if (quadInside(q, xLimit, yLimit)) {
    K::run(s, q, dst);
  } else {
    alignas(16) int32_t X[4], Y[4];
    _mm_store_si128(reinterpret_cast<__m128i*>(X), q.X);
    _mm_store_si128(reinterpret_cast<__m128i*>(Y), q.Y);
    for (int k = 0; k < 4; ++k) samplePixel<T, C>(s, X[k], Y[k], dst + k * C);
  }
}

// One destination row of `width` pixels from the maps' row, by quads, then
// the last pixels one by one.
template <typename T, int C>
void remapRow(const Source<T>& s, const float* mx, const float* my, T* dst, int width) {
  int j = 0;
  for (; j <= width - 4; j += 4) remapQuad<T, C>(s, mx + j, my + j, dst + j * C);
  for (; j < width; ++j)
    samplePixel<T, C>(s, quantise(simd::loadOne(mx + j)), quantise(simd::loadOne(my + j)), dst + j * C);
}

}  // namespace undistort

namespace avx2 {
// The AVX2 form for 8u three-channel rows, built in undistort_avx2.cpp:
// resamples groups of eight pixels from the row's start for as long as
// every neighbourhood of a group lies inside (ix < xLimit, iy < yLimit, no
// negative index) and returns how many pixels it wrote (a multiple of 8).
// Neighbours are gathered at 32-bit offsets from `data`: step * height must
// not exceed INT_MAX.
int remapRow8uC3(const uint8_t* data, int step, int xLimit, int yLimit, const float* mx, const float* my,
                 uint8_t* dst, int width);
}  // namespace avx2
}  // namespace zelcv

#endif  // ZELCV_FILTER_UNDISTORT_KERNELS_H
