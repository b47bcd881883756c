// The streaming derivative rows against a direct two-dimensional sum, for
// every kernel and border kind, on random sizes and layouts.
#include <gtest/gtest.h>

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
