// The Canny detector on images whose rows end (or begin) exactly at an
// inaccessible page, widths 1 to 70: from derivatives of both types and from
// 8-bit images with every derivative kernel and the constant and replicated
// borders (which read nothing outside the rows).
#include <gtest/gtest.h>

#include <random>
#include <vector>

#include "support/guard_page.h"
#include "zelcv.h"

namespace {

using zeltest::GuardedImage;
using zeltest::GuardSide;

TEST(CannyGuard, TouchesNothingOutsideTheRows) {
  std::mt19937 rng(777);
  std::vector<Zel8u> buffer;
  for (GuardSide side : {GuardSide::After, GuardSide::Before})
    for (int width = 1; width <= 70; ++width) {
      const int height = 1 + width % 5;
      const ZeliSize roi = {width, height};
      GuardedImage<Zel8u> src(width, height, 1, side, 0, true), dst(width, height, 1, side, 0, true);
      GuardedImage<Zel16s> dx16(width, height, 1, side, 0, true), dy16(width, height, 1, side, 0, true);
      GuardedImage<Zel32f> dx32(width, height, 1, side, 0, true), dy32(width, height, 1, side, 0, true);
      ASSERT_TRUE(src.ok() && dst.ok() && dx16.ok() && dy16.ok() && dx32.ok() && dy32.ok());
      for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) {
          src.row(y)[x] = Zel8u(rng() % 4 == 0 ? 255 : rng() % 40);
          dx16.row(y)[x] = Zel16s(int(rng() % 400) - 200);
          dy16.row(y)[x] = Zel16s(int(rng() % 400) - 200);
          dx32.row(y)[x] = float(dx16.row(y)[x]);
          dy32.row(y)[x] = float(dy16.row(y)[x]);
        }
      int bytes = 0;
      ASSERT_EQ(zeliCannyGetSize(roi, &bytes), zelStatusOk);
      buffer.assign(size_t(bytes), 0);
      ASSERT_EQ(zeliCanny_16s8u_C1R(dx16.data(), dx16.step(), dy16.data(), dy16.step(), dst.data(), dst.step(), roi,
                                    20.0f, 100.0f, buffer.data()),
                zelStatusOk);
      ASSERT_EQ(zeliCanny_32f8u_C1R(dx32.data(), dx32.step(), dy32.data(), dy32.step(), dst.data(), dst.step(), roi,
                                    20.0f, 100.0f, buffer.data()),
                zelStatusOk);
      const int kernels[][2] = {{zelFilterSobel, zelMaskSize3x3}, {zelFilterScharr, zelMaskSize3x3},
                                {zelFilterSobel, zelMaskSize5x5}};
      for (const auto& k : kernels)
        for (ZeliBorderType border : {zelBorderConstant, zelBorderReplicate})
          for (int norm : {int(zelNormL1), int(zelNormL2)}) {
            ASSERT_EQ(zeliCannyBorderGetSize(roi, k[0], k[1], norm, &bytes), zelStatusOk);
            buffer.assign(size_t(bytes), 0);
            ASSERT_EQ(zeliCannyBorder_8u_C1R(src.data(), src.step(), dst.data(), dst.step(), roi, k[0], k[1], border,
                                             7, 30.0f, 90.0f, norm, buffer.data()),
                      zelStatusOk)
                << "width " << width << " mask " << k[1] << " border " << border;
          }
    }
}

}  // namespace
