// Integral images straight from their definitions, in exact 64-bit integer
// arithmetic: sums of pixels over upright rectangles and over the upward
// 45-degree cones of the tilted integral. Nothing here follows the library's
// row recurrences; row segment sums are the only shortcut.
#ifndef ZELCV_TESTS_INTEGRAL_REFERENCE_H
#define ZELCV_TESTS_INTEGRAL_REFERENCE_H

#include <cstdint>
#include <random>
#include <vector>

#include "support/test_image.h"

namespace zeltest {

// Pixels of a w x h region plus an optional column just right of it.
class PixelSums {
 public:
  // `right(r)` gives the value of the pixel right of the region in row r.
  template <typename Right>
  PixelSums(const TestImage<uint8_t>& src, int w, int h, Right right) : w_(w), h_(h) {
    for (int power = 1; power <= 2; ++power) {
      auto& pre = power == 1 ? prefix_ : prefixSq_;
      pre.assign(size_t(h) * (w + 2), 0);
      for (int r = 0; r < h; ++r)
        for (int c = 0; c <= w; ++c) {
          int64_t v = c < w ? src.at(c, r) : right(r);
          pre[r * (w + 2) + c + 1] = pre[r * (w + 2) + c] + (power == 1 ? v : v * v);
        }
    }
  }
  PixelSums(const TestImage<uint8_t>& src, int w, int h)
      : PixelSums(src, w, h, [](int) { return int64_t(0); }) {}

  // Sum over row r, columns lo..hi (inclusive, clipped to 0..w).
  int64_t segment(int r, int lo, int hi, bool squares) const {
    if (lo < 0) lo = 0;
    if (hi > w_) hi = w_;
    if (lo > hi) return 0;
    const auto& pre = squares ? prefixSq_ : prefix_;
    return pre[r * (w_ + 2) + hi + 1] - pre[r * (w_ + 2) + lo];
  }

  // Plain integral cell (x, y): pixels in rows 0..y-1, columns 0..x-1.
  int64_t plain(int y, int x, bool squares = false) const {
    int64_t s = 0;
    for (int r = 0; r < y; ++r) s += segment(r, 0, x - 1, squares);
    return s;
  }

  // Tilted integral cell (x, n): pixels (r, c), r <= n - 2, in the cone
  // L = x - 1 - (n - 2 - r) <= c <= R = x + (n - 2 - r); column 0 only when
  // L <= 0 is even, column w (right of the region) only when R >= w and
  // R - w is even.
  int64_t tilted(int n, int x, bool squares = false) const {
    int64_t s = 0;
    for (int r = 0; r <= n - 2 && r < h_; ++r) {
      int d = n - 2 - r, L = x - 1 - d, R = x + d;
      s += segment(r, L < 1 ? 1 : L, R < w_ - 1 ? R : w_ - 1, squares);
      if (L <= 0 && L % 2 == 0) s += segment(r, 0, 0, squares);
      if (R >= w_ && (R - w_) % 2 == 0 && w_ > 0) s += segment(r, w_, w_, squares);
    }
    return s;
  }

  // Direct sum over a tilted rectangle with top corner (tx, ty) in integral
  // coordinates: pixels with tx - ty - 2h + 1 <= c - r <= tx - ty and
  // tx + ty - 1 <= c + r <= tx + ty + 2w - 2.
  int64_t tiltedRect(int tx, int ty, int width, int height, bool squares) const {
    int64_t s = 0;
    for (int r = 0; r < h_; ++r)
      for (int c = 0; c <= w_; ++c) {
        int a = c - r, b = c + r;
        if (a >= tx - ty - 2 * height + 1 && a <= tx - ty && b >= tx + ty - 1 &&
            b <= tx + ty + 2 * width - 2)
          s += segment(r, c, c, squares);
      }
    return s;
  }

  // Direct sum over an upright rectangle of pixels.
  int64_t rect(int x, int y, int width, int height, bool squares) const {
    int64_t s = 0;
    for (int r = y; r < y + height; ++r)
      for (int c = x; c < x + width; ++c) s += segment(r, c, c, squares);
    return s;
  }

 private:
  int w_, h_;
  std::vector<int64_t> prefix_, prefixSq_;
};

// A layout for an image of exactly w x h elements of `elementBytes`: a
// minimal step or a padded one, start offset a multiple of the element size.
inline Layout exactLayout(std::mt19937& rng, int w, int h, int elementBytes, bool minimal) {
  Layout l;
  l.width = w;
  l.height = h;
  l.padBytes = minimal ? 0 : std::uniform_int_distribution<int>(1, 5)(rng) * elementBytes;
  l.offsetBytes = std::uniform_int_distribution<int>(0, 15 / elementBytes)(rng) * elementBytes;
  return l;
}

// Random bytes over every element (what a fresh, uncleared buffer holds).
template <typename T>
void fillGarbage(TestImage<T>& image, std::mt19937& rng) {
  for (int y = 0; y < image.height(); ++y) {
    uint8_t* p = reinterpret_cast<uint8_t*>(image.row(y));
    for (size_t i = 0; i < size_t(image.width()) * sizeof(T); ++i) p[i] = uint8_t(rng());
  }
}

// The first element that differs bitwise from expected(x, y).
template <typename T, typename Expected>
::testing::AssertionResult sameBits(const TestImage<T>& got, Expected expected) {
  for (int y = 0; y < got.height(); ++y)
    for (int x = 0; x < got.width(); ++x) {
      T want = expected(x, y);
      if (std::memcmp(&want, &got.at(x, y), sizeof(T)) != 0)
        return ::testing::AssertionFailure() << "at (" << x << ", " << y << ") of " << got.width()
                                             << " x " << got.height() << ": got " << got.at(x, y)
                                             << ", want " << want;
    }
  return ::testing::AssertionSuccess();
}

}  // namespace zeltest

#endif  // ZELCV_TESTS_INTEGRAL_REFERENCE_H
