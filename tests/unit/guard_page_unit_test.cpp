// The guarded test memory: rows sit where the header says, every byte of
// them is usable, and the byte just past (or before) them is not.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>

#include "support/guard_page.h"

namespace {

using zeltest::GuardedImage;
using zeltest::GuardSide;

bool pageAligned(const void* p) { return reinterpret_cast<uintptr_t>(p) % zeltest::pageSize() == 0; }

TEST(GuardPage, RowsTouchTheGuardWhereTheLayoutSays) {
  for (int width : {1, 3, 17, 1000, 5000})
    for (int height : {1, 2, 5})
      for (int extra : {0, 1, 6}) {
        const size_t rowBytes = size_t(width) * 3 * sizeof(float);
        GuardedImage<float> after(width, height, 3, GuardSide::After, rowBytes + extra);
        ASSERT_TRUE(after.ok());
        EXPECT_EQ(after.step(), int(rowBytes + extra));
        EXPECT_TRUE(pageAligned(reinterpret_cast<uint8_t*>(after.row(height - 1)) + rowBytes));
        GuardedImage<float> before(width, height, 3, GuardSide::Before, rowBytes + extra);
        ASSERT_TRUE(before.ok());
        EXPECT_TRUE(pageAligned(before.data()));
        for (GuardSide side : {GuardSide::After, GuardSide::Before}) {
          GuardedImage<float> every(width, height, 3, side, 0, true);
          ASSERT_TRUE(every.ok());
          EXPECT_GE(size_t(every.step()), rowBytes);
          for (int y = 0; y < height; ++y) {
            uint8_t* row = reinterpret_cast<uint8_t*>(every.row(y));
            EXPECT_TRUE(pageAligned(side == GuardSide::After ? row + rowBytes : row));
            std::memset(row, 0x5A, rowBytes);  // every byte of every row is writable
          }
        }
        for (int y = 0; y < height; ++y) {
          std::memset(after.row(y), 1, rowBytes);
          std::memset(before.row(y), 1, rowBytes);
        }
      }
}

#if GTEST_HAS_DEATH_TEST
TEST(GuardPageDeathTest, OneByteOutsideFaults) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  GuardedImage<uint8_t> after(13, 2, 1, GuardSide::After);
  GuardedImage<uint8_t> before(13, 2, 1, GuardSide::Before);
  ASSERT_TRUE(after.ok() && before.ok());
  volatile uint8_t* pastEnd = after.row(1) + 13;
  volatile uint8_t* beforeStart = before.row(0) - 1;
  EXPECT_DEATH((void)*pastEnd, "");
  EXPECT_DEATH((void)*beforeStart, "");
}
#endif

}  // namespace
