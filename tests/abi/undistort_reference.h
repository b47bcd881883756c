// A plain reference of lens undistortion: the camera model written out in
// its documented order, 1/32-pixel quantisation and the bilinear weights,
// one pixel at a time with no shortcuts.
#ifndef ZELCV_TESTS_UNDISTORT_REFERENCE_H
#define ZELCV_TESTS_UNDISTORT_REFERENCE_H

#include <climits>
#include <cmath>
#include <type_traits>

#include "support/test_image.h"
#include "zelcv.h"

namespace undistortref {

struct Camera {
  float fx, fy, cx, cy, k1, k2, p1, p2;
};

inline void sourcePoint(const Camera& c, int j, int i, float& u, float& v) {
  const float ifx = 1.0f / c.fx, ify = 1.0f / c.fy;
  const float x = (float(j) - c.cx) * ifx;
  const float y = (float(i) - c.cy) * ify;
  const float x2 = x * x, y2 = y * y;
  const float r2 = x2 + y2;
  const float t = (x * y) * 2.0f;
  const float kr = (c.k2 * r2 + c.k1) * r2 + 1.0f;
  const float xd = x * kr + (c.p1 * t + c.p2 * (r2 + (x2 + x2)));
  const float yd = y * kr + (c.p1 * (r2 + (y2 + y2)) + c.p2 * t);
  u = xd * c.fx + c.cx;
  v = yd * c.fy + c.cy;
}

// rint(u * 32), ties to even; NaN and out-of-range products give INT_MIN.
inline int quantise(float u) {
  const float t = u * 32.0f;
  if (!(t >= -2147483648.0f && t < 2147483648.0f)) return INT_MIN;
  return int(std::nearbyint(t));
}

template <typename T>
T sample(const zeltest::TestImage<T>& src, float u, float v, int c) {
  const int X = quantise(u), Y = quantise(v);
  const int ix = X >> 5, iy = Y >> 5, fx = X & 31, fy = Y & 31;
  auto p = [&](int x, int y) -> T {
    return x >= 0 && x < src.width() && y >= 0 && y < src.height() ? src.at(x, y, c) : T(0);
  };
  const int w00 = (32 - fx) * (32 - fy), w01 = fx * (32 - fy), w10 = (32 - fx) * fy, w11 = fx * fy;
  if constexpr (std::is_same<T, float>::value) {
    const float s = 1.0f / 1024.0f;
    return ((p(ix, iy) * (float(w00) * s) + p(ix + 1, iy) * (float(w01) * s)) + p(ix, iy + 1) * (float(w10) * s)) +
           p(ix + 1, iy + 1) * (float(w11) * s);
  } else {
    const int sum = w00 * p(ix, iy) + w01 * p(ix + 1, iy) + w10 * p(ix, iy + 1) + w11 * p(ix + 1, iy + 1);
    return T((sum + 512) >> 10);
  }
}

}  // namespace undistortref

#endif  // ZELCV_TESTS_UNDISTORT_REFERENCE_H
