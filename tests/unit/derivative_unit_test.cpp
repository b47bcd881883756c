// The streaming derivative rows (8u and 32f) against direct sums, for
// every kernel and border kind, on random sizes and layouts.
#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <vector>

#include "filter/derivative.h"
#include "support/canny_reference.h"
#include "support/test_image.h"

namespace {

using zelcv::DerivativeKernel;
using zelcv::DerivativeRows;

constexpr int kMargin = 3;  // real pixels around the region for in-memory sides

void checkCase(std::mt19937& rng, int kernel, int border, int width, int height, bool extremes) {
  zeltest::Layout layout;
  layout.width = width + 2 * kMargin;
  layout.height = height + 2 * kMargin;
  layout.padBytes = std::uniform_int_distribution<int>(0, 7)(rng);
  layout.offsetBytes = std::uniform_int_distribution<int>(0, 15)(rng);
  zeltest::TestImage<Zel8u> image(layout);
  image.fillRandom(rng, 0, 255);
  // Only 0 and 255: the largest sums the 16-bit lanes must hold.
  if (extremes)
    for (int y = 0; y < image.height(); ++y)
      for (int x = 0; x < image.width(); ++x) image.at(x, y) = image.at(x, y) < 128 ? 0 : 255;
  const Zel8u* roi = &image.at(kMargin, kMargin);
  const Zel8u value = Zel8u(rng());

  std::vector<Zel16s> rdx, rdy;
  zeltest::referenceDerivatives(roi, image.step(), width, height, kernel, border, value, rdx, rdy);

  const DerivativeKernel kinds[] = {DerivativeKernel::kSobel3x3, DerivativeKernel::kScharr3x3,
                                    DerivativeKernel::kSobel5x5};
  std::vector<uint8_t> scratch(DerivativeRows::scratchBytes(kinds[kernel], width) + 1);
  // Odd start: the rows align their scratch themselves.
  DerivativeRows rows(roi, image.step(), {width, height}, kinds[kernel], border, value, scratch.data() + 1);
  std::vector<Zel16s> dx(width + 1, 0x5A5A), dy(width + 1, 0x5A5A);
  for (int y = 0; y < height; ++y) {
    rows.row(y, dx.data(), dy.data());
    for (int x = 0; x < width; ++x) {
      ASSERT_EQ(dx[x], rdx[size_t(y) * width + x]) << "dx x=" << x << " y=" << y;
      ASSERT_EQ(dy[x], rdy[size_t(y) * width + x]) << "dy x=" << x << " y=" << y;
    }
    ASSERT_EQ(dx[width], 0x5A5A);
    ASSERT_EQ(dy[width], 0x5A5A);
  }
}

TEST(DerivativeRows, MatchDirectSumsForEveryKernelAndBorder) {
  std::mt19937 rng(11);
  const int borders[] = {0, 1, 2, 3, 4, 6, 0x10, 0x21, 0x40, 0x81, 0x30 | 1, 0xC0, 0x50, 0xA1};
  for (int kernel = 0; kernel < 3; ++kernel)
    for (int border : borders)
      for (int trial = 0; trial < 6; ++trial) {
        SCOPED_TRACE(testing::Message() << "kernel " << kernel << " border " << border << " trial " << trial);
        const int width = trial < 2 ? trial + 1 : std::uniform_int_distribution<int>(1, 70)(rng);
        const int height = trial == 0 ? 1 : std::uniform_int_distribution<int>(1, 9)(rng);
        checkCase(rng, kernel, border, width, height, trial == 5);
      }
}

}  // namespace

// ---- 32f rows: the engine's arithmetic, one row at a time ----------------------

namespace {

using zelcv::DerivativeRows32f;

// The float pixel standing for (x, y): rows first, then columns within the
// row; a constant rule on either axis gives the border value.
float pixel32f(const Zel32f* src, int step, int width, int height, int border, float value, int x, int y) {
  const int kind = border & 0x0F;
  auto inMem = [&](int flag) { return (border & flag) || kind == zelBorderInMemory; };
  auto map = [&](int i, int n) {
    if (kind == zelBorderReplicate) return i < 0 ? 0 : n - 1;
    if (kind == zelBorderWrap) return ((i % n) + n) % n;
    if (kind == zelBorderMirror) {
      if (n == 1) return 0;
      const int p = 2 * (n - 1), r = ((i % p) + p) % p;
      return r < n ? r : p - r;
    }
    const int p = 2 * n, r = ((i % p) + p) % p;
    return r < n ? r : p - 1 - r;
  };
  if ((y < 0 || y >= height) && !inMem(y < 0 ? zelBorderInMemTop : zelBorderInMemBottom)) {
    if (kind == zelBorderConstant) return value;
    y = map(y, height);
  }
  if ((x < 0 || x >= width) && !inMem(x < 0 ? zelBorderInMemLeft : zelBorderInMemRight)) {
    if (kind == zelBorderConstant) return value;
    x = map(x, width);
  }
  return reinterpret_cast<const Zel32f*>(reinterpret_cast<const uint8_t*>(src) + std::ptrdiff_t(y) * step)[x];
}

// Per window row the row taps in double, tap 0 first, rounded to float; then
// the column taps over those in float, tap 0 first. Every tap, zeros too.
void reference32f(const Zel32f* src, int step, int width, int height, int kernel, int border, float value, int x,
                  int y, float* dx, float* dy) {
  const zeltest::DerivativeTaps t = zeltest::derivativeTaps(kernel);
  const int k = 2 * t.radius + 1;
  for (int i = 0; i < k; ++i) {
    double a = 0.0, b = 0.0;
    for (int j = 0; j < k; ++j) {
      const double p = pixel32f(src, step, width, height, border, value, x - t.radius + j, y - t.radius + i);
      const double pa = double(t.derive[j]) * p, pb = double(t.smooth[j]) * p;
      a = j == 0 ? pa : a + pa;
      b = j == 0 ? pb : b + pb;
    }
    const float ca = float(t.smooth[i]) * float(a), cb = float(t.derive[i]) * float(b);
    *dx = i == 0 ? ca : *dx + ca;
    *dy = i == 0 ? cb : *dy + cb;
  }
}

bool sameFloat(float a, float b) { return std::memcmp(&a, &b, sizeof a) == 0 || (a != a && b != b); }

TEST(DerivativeRows32f, MatchTheEngineSumsForEveryKernelAndBorder) {
  std::mt19937 rng(29);
  const DerivativeKernel kinds[] = {DerivativeKernel::kSobel3x3, DerivativeKernel::kScharr3x3,
                                    DerivativeKernel::kSobel5x5};
  const int borders[] = {0, 1, 2, 3, 4, 6, 0x10, 0x21, 0x40, 0x81, 0xC3, 0x34};
  for (int kernel = 0; kernel < 3; ++kernel)
    for (int border : borders)
      for (int trial = 0; trial < 5; ++trial) {
        const int width = trial == 0 ? 1 : std::uniform_int_distribution<int>(1, trial < 3 ? 20 : 150)(rng);
        const int height = std::uniform_int_distribution<int>(1, 7)(rng);
        SCOPED_TRACE(testing::Message() << "kernel " << kernel << " border " << border << " " << width << "x"
                                        << height);
        zeltest::Layout layout;
        layout.width = width + 2 * kMargin;
        layout.height = height + 2 * kMargin;
        layout.padBytes = 4 * std::uniform_int_distribution<int>(0, 3)(rng);
        layout.offsetBytes = 4 * std::uniform_int_distribution<int>(0, 3)(rng);
        zeltest::TestImage<Zel32f> image(layout);
        image.fillRandom(rng, -300.0f, 300.0f);
        const Zel32f* roi = &image.at(kMargin, kMargin);
        const float value = std::uniform_real_distribution<float>(-50.0f, 50.0f)(rng);
        const size_t bytes = DerivativeRows32f::scratchBytes(kinds[kernel], width);
        ASSERT_LE(bytes, 8 * size_t(width) + 48);  // the room callers reserve
        std::vector<uint8_t> scratch(bytes + 3);
        DerivativeRows32f rows(roi, image.step(), {width, height}, kinds[kernel], border, value, scratch.data() + 3);
        std::vector<Zel32f> dx(width + 1, 7.0f), dy(width + 1, 7.0f);
        // Rows in any order: each is computed on its own.
        for (int n = 0; n < height; ++n) {
          const int y = (n * 5 + 3) % height;
          rows.row(y, dx.data(), dy.data());
          for (int x = 0; x < width; ++x) {
            float rx = 0, ry = 0;
            reference32f(roi, image.step(), width, height, kernel, border, value, x, y, &rx, &ry);
            ASSERT_TRUE(sameFloat(dx[x], rx)) << "dx x=" << x << " y=" << y << ": " << dx[x] << " vs " << rx;
            ASSERT_TRUE(sameFloat(dy[x], ry)) << "dy x=" << x << " y=" << y << ": " << dy[x] << " vs " << ry;
          }
          ASSERT_EQ(dx[width], 7.0f);
          ASSERT_EQ(dy[width], 7.0f);
        }
      }
}

// The whole-image Scharr derivatives run the engine's ring; the rows give
// the same bits.
TEST(DerivativeRows32f, AgreeWithTheRingEngine) {
  std::mt19937 rng(30);
  for (int border : {zelBorderReplicate, zelBorderConstant, zelBorderMirror})
    for (int trial = 0; trial < 4; ++trial) {
      const int width = std::uniform_int_distribution<int>(1, 120)(rng);
      const int height = std::uniform_int_distribution<int>(1, 12)(rng);
      zeltest::Layout layout;
      layout.width = width;
      layout.height = height;
      zeltest::TestImage<Zel32f> image(layout);
      image.fillRandom(rng, -1000.0f, 1000.0f);
      std::vector<Zel32f> gx(size_t(width) * height), gy(gx.size());
      std::vector<Zel8u> buffer(size_t(zelcv::scharr32fBufferBytes(width)));
      zelcv::scharr32f(image.data(), image.step(), {width, height}, border, gx.data(), width * 4, gy.data(),
                       width * 4, buffer.data());
      std::vector<uint8_t> scratch(DerivativeRows32f::scratchBytes(DerivativeKernel::kScharr3x3, width));
      DerivativeRows32f rows(image.data(), image.step(), {width, height}, DerivativeKernel::kScharr3x3, border, 0.0f,
                             scratch.data());
      std::vector<Zel32f> dx(width), dy(width);
      for (int y = 0; y < height; ++y) {
        rows.row(y, dx.data(), dy.data());
        for (int x = 0; x < width; ++x) {
          ASSERT_TRUE(sameFloat(dx[x], gx[size_t(y) * width + x])) << x << "," << y;
          ASSERT_TRUE(sameFloat(dy[x], gy[size_t(y) * width + x])) << x << "," << y;
        }
      }
    }
}

}  // namespace
