// The sums of one Lucas-Kanade iteration over a rectangle of the windows:
// the gradient matrix (Gxx, Gxy, Gyy) and the mismatch vector (bx, by) with
// the squared difference e. Every product is formed in double from float
// operands and added into four lanes, lane c taking the columns
// x0 + 4m + c of every row, rows top to bottom; the lanes end as
// (lane0 + lane1) + (lane2 + lane3). The SSE2 code keeps the lanes in two
// registers; its tail adds products masked to zero, which leaves a lane's
// bits as they were (a lane that starts at +0 never holds -0).
#ifndef ZELCV_MOTION_OPTFLOW_SUMS_H
#define ZELCV_MOTION_OPTFLOW_SUMS_H

#include <emmintrin.h>
#include <stddef.h>
#include <stdint.h>

#include "stats/subpix.h"
#include "zelcv.h"

namespace zelcv {
namespace optflow {

// Windows of `stride` floats (doubles for the converted gradients) a row;
// every row holds at least x0 + width + 3 elements so that the last group of
// four may read past the rectangle.
struct WindowSet {
  const float* i;    // first image
  const float* j;    // second image
  const double* ix;  // first-image derivatives, converted to double
  const double* iy;
  int stride;
};

struct GradientSums {
  double xx, xy, yy;
};
struct MismatchSums {
  double bx, by, e;
};

namespace detail {

// Lanes 0-1 in lo, lanes 2-3 in hi.
struct Lanes {
  __m128d lo = _mm_setzero_pd(), hi = _mm_setzero_pd();
  void add(__m128d a, __m128d b) {
    lo = _mm_add_pd(lo, a);
    hi = _mm_add_pd(hi, b);
  }
  double total() const {
    double l[4];
    _mm_storeu_pd(l, lo);
    _mm_storeu_pd(l + 2, hi);
    return (l[0] + l[1]) + (l[2] + l[3]);
  }
};

// All-ones in the first n of four lanes (n = 1 .. 4), as two double masks.
inline void tailMask(int n, __m128d* lo, __m128d* hi) {
  const __m128i ones = _mm_set1_epi32(-1);
  const __m128i l = n >= 2 ? ones : _mm_set_epi32(0, 0, -1, -1);
  const __m128i h = n >= 4 ? ones : n == 3 ? _mm_set_epi32(0, 0, -1, -1) : _mm_setzero_si128();
  *lo = _mm_castsi128_pd(l);
  *hi = _mm_castsi128_pd(h);
}

}  // namespace detail

inline GradientSums gradientSums(const WindowSet& w, ZeliRect r) {
  detail::Lanes xx, xy, yy;
  __m128d mlo, mhi;
  detail::tailMask(((r.width - 1) & 3) + 1, &mlo, &mhi);
  const int full = (r.width - 1) & ~3;  // columns before the last group
  for (int y = r.y; y < r.y + r.height; ++y) {
    const double* gx = w.ix + ptrdiff_t(y) * w.stride + r.x;
    const double* gy = w.iy + ptrdiff_t(y) * w.stride + r.x;
    auto group = [&](int c, __m128d lo, __m128d hi) {
      const __m128d x0 = _mm_loadu_pd(gx + c), x1 = _mm_loadu_pd(gx + c + 2);
      const __m128d y0 = _mm_loadu_pd(gy + c), y1 = _mm_loadu_pd(gy + c + 2);
      xx.add(_mm_and_pd(_mm_mul_pd(x0, x0), lo), _mm_and_pd(_mm_mul_pd(x1, x1), hi));
      xy.add(_mm_and_pd(_mm_mul_pd(x0, y0), lo), _mm_and_pd(_mm_mul_pd(x1, y1), hi));
      yy.add(_mm_and_pd(_mm_mul_pd(y0, y0), lo), _mm_and_pd(_mm_mul_pd(y1, y1), hi));
    };
    const __m128d all = _mm_castsi128_pd(_mm_set1_epi32(-1));
    for (int c = 0; c < full; c += 4) group(c, all, all);
    group(full, mlo, mhi);
  }
  return {xx.total(), xy.total(), yy.total()};
}

inline MismatchSums mismatchSums(const WindowSet& w, ZeliRect r) {
  detail::Lanes bx, by, e;
  __m128d mlo, mhi;
  detail::tailMask(((r.width - 1) & 3) + 1, &mlo, &mhi);
  const int full = (r.width - 1) & ~3;
  for (int y = r.y; y < r.y + r.height; ++y) {
    const ptrdiff_t at = ptrdiff_t(y) * w.stride + r.x;
    const float* a = w.i + at;
    const float* b = w.j + at;
    const double* gx = w.ix + at;
    const double* gy = w.iy + at;
    auto group = [&](int c, __m128d lo, __m128d hi) {
      const __m128 d = _mm_sub_ps(_mm_loadu_ps(a + c), _mm_loadu_ps(b + c));
      const __m128d d0 = _mm_cvtps_pd(d), d1 = _mm_cvtps_pd(_mm_movehl_ps(d, d));
      bx.add(_mm_and_pd(_mm_mul_pd(d0, _mm_loadu_pd(gx + c)), lo),
             _mm_and_pd(_mm_mul_pd(d1, _mm_loadu_pd(gx + c + 2)), hi));
      by.add(_mm_and_pd(_mm_mul_pd(d0, _mm_loadu_pd(gy + c)), lo),
             _mm_and_pd(_mm_mul_pd(d1, _mm_loadu_pd(gy + c + 2)), hi));
      e.add(_mm_and_pd(_mm_mul_pd(d0, d0), lo), _mm_and_pd(_mm_mul_pd(d1, d1), hi));
    };
    const __m128d all = _mm_castsi128_pd(_mm_set1_epi32(-1));
    for (int c = 0; c < full; c += 4) group(c, all, all);
    group(full, mlo, mhi);
  }
  return {bx.total(), by.total(), e.total()};
}

}  // namespace optflow

// The same sums with AVX2, the same bits. Defined in optflow_sums_avx2.cpp.
namespace avx2 {
optflow::GradientSums optflowGradientSums(const optflow::WindowSet& w, ZeliRect r);
optflow::MismatchSums optflowMismatchSums(const optflow::WindowSet& w, ZeliRect r);
// The sub-pixel window copy of an n x n window (n >= 8) whose every tap
// lies inside the image, rows and columns unclamped: the copy's values.
void optflowInteriorWindow(const Zel8u* src, int step, float* dst, int dstStride, int n, const subpix::Placement& p);
void optflowInteriorWindow(const Zel16u* src, int step, float* dst, int dstStride, int n, const subpix::Placement& p);
void optflowInteriorWindow(const Zel32f* src, int step, float* dst, int dstStride, int n, const subpix::Placement& p);
// Columns [0, count) (count >= 8) of a window row read from a 16-bit
// derivative plane, the taps scaled by 1/32 as optflow.cpp's copy scales
// them, stored as doubles; a0 and a1 point at the row's first taps.
void optflowScaledInterior(const Zel16s* a0, const Zel16s* a1, double* d, int count, const subpix::Placement& p);
}  // namespace avx2
}  // namespace zelcv

#endif  // ZELCV_MOTION_OPTFLOW_SUMS_H
