// Accumulation and differences on images whose rows end (or begin) exactly
// at an inaccessible page: every export, widths 1 to 70, in place where the
// export writes its accumulator. A read or write past any row faults.
#include <gtest/gtest.h>

#include <memory>
#include <random>
#include <vector>

#include "abi/arith_table.h"
#include "support/guard_page.h"

namespace {

using arithtest::Export;
using zeltest::GuardedRows;
using zeltest::GuardSide;

class ArithGuard : public ::testing::TestWithParam<Export> {};

TEST_P(ArithGuard, TouchesNothingOutsideTheRows) {
  const Export& e = GetParam();
  const std::vector<arithtest::Slot> slots = arithtest::slotsOf(e);
  std::mt19937 rng(31337);
  for (GuardSide side : {GuardSide::After, GuardSide::Before})
    for (int width = 1; width <= 70; ++width) {
      const int height = 1 + width % 3;
      std::vector<std::unique_ptr<GuardedRows>> images;
      arithtest::Args args;
      args.roi = {width, height};
      args.value = 3;
      for (size_t i = 0; i < slots.size(); ++i) {
        const size_t rowBytes = size_t(width) * slots[i].channels * slots[i].elementBytes;
        images.push_back(std::make_unique<GuardedRows>(rowBytes, height, side, 0, true));
        ASSERT_TRUE(images.back()->ok());
        for (int y = 0; y < height; ++y)
          for (size_t b = 0; b < rowBytes; ++b)  // small values, some masked off
            images.back()->row(y)[b] = uint8_t(slots[i].mask ? rng() % 3 : rng() % 64);
        args.image[i] = images.back()->start();
        args.step[i] = int(images.back()->step());
      }
      ASSERT_EQ(e.call(args), zelStatusOk) << "width " << width;
    }
}

INSTANTIATE_TEST_SUITE_P(AllExports, ArithGuard, ::testing::ValuesIn(arithtest::exports()),
                         [](const ::testing::TestParamInfo<Export>& info) { return std::string(info.param.name); });

}  // namespace
