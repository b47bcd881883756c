// What the standard and the probabilistic Hough transforms share: the
// accumulator geometry, the angle tables and the vote of one pixel.
#ifndef ZELCV_FEATURES_HOUGH_KERNELS_H
#define ZELCV_FEATURES_HOUGH_KERNELS_H

#include <emmintrin.h>
#include <stdint.h>

#include <cmath>

#include "zelcv.h"

namespace zelcv {
namespace hough {

constexpr double kPi = 3.14159265358979323846;
// Beyond this many angles or rho cells no buffer could fit in an int.
constexpr double kMaxCells = 1 << 28;

inline bool deltaValid(ZeliPoint_32f delta) {
  return std::isfinite(delta.x) && std::isfinite(delta.y) && delta.x > 0.0f && delta.y > 0.0f;
}

// Rho cells: round((2 (W + H) + 1) / drho) in float, half to even; -1 when
// absurdly many.
inline int64_t rhoCells(ZeliSize roi, float drho) {
  const float q = float(2 * (int64_t(roi.width) + roi.height) + 1) / drho;
  if (!(q < float(kMaxCells))) return -1;
  return int64_t(std::nearbyint(q));
}

// Angles: round((thetaMax - thetaMin) / dtheta) in double, half to even.
inline int64_t angleCount(double span, float dtheta) {
  const double q = span / double(dtheta);
  if (!(q < kMaxCells)) return -1;
  return int64_t(std::nearbyint(q));
}

// C[n] = cos(a_n) * irho, S[n] = sin(a_n) * irho, a_n accumulated in float.
inline void trigTables(int angles, float thetaMin, float dtheta, float drho, float* c, float* s) {
  const float irho = 1.0f / drho;
  float a = thetaMin;
  for (int n = 0; n < angles; ++n, a += dtheta) {
    c[n] = float(std::cos(double(a)) * irho);
    s[n] = float(std::sin(double(a)) * irho);
  }
}

// Adds `sign` to the cell of every angle for pixel (x, y): cell n * rowStride
// + round(x C[n] + y S[n]) + offset. The vector loop rounds four angles at
// once to nearest even, as the scalar one does.
inline void vote(int* acc, int rowStride, int offset, const float* c, const float* s, int angles, int x, int y,
                 int sign) {
  const float fx = float(x), fy = float(y);
  int n = 0;
  const __m128 vx = _mm_set1_ps(fx), vy = _mm_set1_ps(fy);
  alignas(16) int r[4];
  for (; n + 4 <= angles; n += 4) {
    const __m128 t = _mm_add_ps(_mm_mul_ps(vx, _mm_loadu_ps(c + n)), _mm_mul_ps(vy, _mm_loadu_ps(s + n)));
    _mm_store_si128(reinterpret_cast<__m128i*>(r), _mm_cvtps_epi32(t));
    acc[(n + 0) * rowStride + r[0] + offset] += sign;
    acc[(n + 1) * rowStride + r[1] + offset] += sign;
    acc[(n + 2) * rowStride + r[2] + offset] += sign;
    acc[(n + 3) * rowStride + r[3] + offset] += sign;
  }
  for (; n < angles; ++n) {
    const float t = fx * c[n] + fy * s[n];
    acc[n * rowStride + _mm_cvtss_si32(_mm_set_ss(t)) + offset] += sign;
  }
}

// vote(..., +1) that also returns the angle whose cell is now the largest
// above `floor` (the first such angle on ties), or -1. Different angles
// never share a cell, so this is the vote followed by a scan of the cells.
inline int voteBest(int* acc, int rowStride, int offset, const float* c, const float* s, int angles, int x, int y,
                    int floor) {
  const float fx = float(x), fy = float(y);
  int n = 0, best = floor, bestAngle = -1;
  const __m128 vx = _mm_set1_ps(fx), vy = _mm_set1_ps(fy);
  alignas(16) int r[4];
  auto bump = [&](int angle, int rho) {
    const int v = ++acc[angle * rowStride + rho + offset];
    if (v > best) {
      best = v;
      bestAngle = angle;
    }
  };
  for (; n + 4 <= angles; n += 4) {
    const __m128 t = _mm_add_ps(_mm_mul_ps(vx, _mm_loadu_ps(c + n)), _mm_mul_ps(vy, _mm_loadu_ps(s + n)));
    _mm_store_si128(reinterpret_cast<__m128i*>(r), _mm_cvtps_epi32(t));
    bump(n, r[0]);
    bump(n + 1, r[1]);
    bump(n + 2, r[2]);
    bump(n + 3, r[3]);
  }
  for (; n < angles; ++n) bump(n, _mm_cvtss_si32(_mm_set_ss(fx * c[n] + fy * s[n])));
  return bestAngle;
}

}  // namespace hough
}  // namespace zelcv

#endif  // ZELCV_FEATURES_HOUGH_KERNELS_H
