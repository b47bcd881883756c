// Plain reference implementations for the derivative filters and the Canny
// detector: whole images, direct sums, a full magnitude image and a queue for
// the hysteresis. Slow and obvious on purpose.
#ifndef ZELCV_TESTS_CANNY_REFERENCE_H
#define ZELCV_TESTS_CANNY_REFERENCE_H

#include <cmath>
#include <cstdint>
#include <cstring>
#include <deque>
#include <type_traits>
#include <vector>

#include "zelcv.h"

namespace zeltest {

// Derivative kernels: 0 = 3x3 Sobel, 1 = 3x3 Scharr, 2 = 5x5 Sobel.
struct DerivativeTaps {
  int radius;
  int smooth[5];
  int derive[5];
};
inline DerivativeTaps derivativeTaps(int kernel) {
  if (kernel == 0) return {1, {1, 2, 1}, {-1, 0, 1}};
  if (kernel == 1) return {1, {3, 10, 3}, {-1, 0, 1}};
  return {2, {1, 4, 6, 4, 1}, {-1, -2, 0, 2, 1}};
}

// The source pixel standing for (x, y), any position: rows outside follow the
// top/bottom rule, then columns outside follow the left/right rule within
// the row chosen; a constant rule on either axis gives the border value.
inline int borderPixel(const Zel8u* src, int step, int width, int height, int border, Zel8u value, int x,
                       int y) {
  const int kind = border & 0x0F;
  auto inMem = [&](int flag) { return (border & flag) || kind == 6; };
  auto map = [&](int i, int n) {  // replicate, wrap, mirror, mirror with edge
    if (kind == 1) return i < 0 ? 0 : n - 1;
    if (kind == 2) return ((i % n) + n) % n;
    if (kind == 3) {
      if (n == 1) return 0;
      int p = 2 * (n - 1), r = ((i % p) + p) % p;
      return r < n ? r : p - r;
    }
    int p = 2 * n, r = ((i % p) + p) % p;
    return r < n ? r : p - 1 - r;
  };
  if (y < 0 || y >= height) {
    if (!inMem(y < 0 ? 0x10 : 0x20)) {
      if (kind == 0) return value;
      y = map(y, height);
    }
  }
  if (x < 0 || x >= width) {
    if (!inMem(x < 0 ? 0x40 : 0x80)) {
      if (kind == 0) return value;
      x = map(x, width);
    }
  }
  return src[std::ptrdiff_t(y) * step + x];
}

inline void referenceDerivatives(const Zel8u* src, int step, int width, int height, int kernel, int border,
                                 Zel8u value, std::vector<Zel16s>& dx, std::vector<Zel16s>& dy) {
  const DerivativeTaps t = derivativeTaps(kernel);
  dx.assign(size_t(width) * height, 0);
  dy.assign(size_t(width) * height, 0);
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x) {
      int sx = 0, sy = 0;
      for (int i = -t.radius; i <= t.radius; ++i)
        for (int j = -t.radius; j <= t.radius; ++j) {
          int p = borderPixel(src, step, width, height, border, value, x + j, y + i);
          sx += t.smooth[i + t.radius] * t.derive[j + t.radius] * p;
          sy += t.derive[i + t.radius] * t.smooth[j + t.radius] * p;
        }
      dx[size_t(y) * width + x] = Zel16s(sx);
      dy[size_t(y) * width + x] = Zel16s(sy);
    }
}

inline float floatFromBits(uint32_t bits) {
  float f;
  std::memcpy(&f, &bits, sizeof f);
  return f;
}

struct CannyRule {
  bool keepEqualLow;  // derivative inputs keep m == low; the image entry does not
  bool l2;
};

// dx, dy: width x height values of type T (Zel16s or Zel32f), densely stored.
template <typename T>
std::vector<Zel8u> referenceCanny(const std::vector<T>& dx, const std::vector<T>& dy, int width, int height,
                                  float low, float high, CannyRule rule) {
  const float t1 = floatFromBits(0x3ED413CD), t2 = floatFromBits(0x401A827A);
  const int fw = width + 2;
  std::vector<float> mag(size_t(fw) * (height + 2), 0.0f);  // zero frame
  auto M = [&](int x, int y) { return mag[size_t(y + 1) * fw + (x + 1)]; };
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x) {
      const T vx = dx[size_t(y) * width + x], vy = dy[size_t(y) * width + x];
      const double a = double(vx), b = double(vy);
      float m;
      if (rule.l2)
        m = float(std::sqrt(a * a + b * b));
      else if (std::is_floating_point<T>::value)
        m = std::fabs(float(vx)) + std::fabs(float(vy));  // single-precision sum
      else
        m = float(std::fabs(a) + std::fabs(b));
      bool keep = rule.keepEqualLow ? !(m < low) : (m > low);
      mag[size_t(y + 1) * fw + (x + 1)] = keep ? m : 0.0f;
    }
  std::vector<uint8_t> candidate(size_t(width) * height, 0);
  std::vector<Zel8u> out(size_t(width) * height, 0);
  std::deque<std::pair<int, int>> queue;
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x) {
      const float m = M(x, y);
      if (m == 0.0f) continue;
      const T vx = dx[size_t(y) * width + x], vy = dy[size_t(y) * width + x];
      const float ax = std::fabs(float(vx)), ay = std::fabs(float(vy));
      bool isMax;
      if (t2 * ax < ay) {
        isMax = M(x, y - 1) < m && M(x, y + 1) <= m;
      } else if (ay < t1 * ax) {
        isMax = M(x - 1, y) < m && M(x + 1, y) <= m;
      } else if (std::signbit(float(vx)) == std::signbit(float(vy))) {
        isMax = M(x + 1, y + 1) < m && M(x - 1, y - 1) < m;
      } else {
        isMax = M(x - 1, y + 1) < m && M(x + 1, y - 1) < m;
      }
      if (!isMax) continue;
      candidate[size_t(y) * width + x] = 1;
      if (m > high) {
        out[size_t(y) * width + x] = 255;
        queue.emplace_back(x, y);
      }
    }
  while (!queue.empty()) {
    auto [x, y] = queue.front();
    queue.pop_front();
    for (int i = -1; i <= 1; ++i)
      for (int j = -1; j <= 1; ++j) {
        int nx = x + j, ny = y + i;
        if (nx < 0 || ny < 0 || nx >= width || ny >= height) continue;
        size_t k = size_t(ny) * width + nx;
        if (candidate[k] && !out[k]) {
          out[k] = 255;
          queue.emplace_back(nx, ny);
        }
      }
  }
  return out;
}

}  // namespace zeltest

#endif  // ZELCV_TESTS_CANNY_REFERENCE_H
