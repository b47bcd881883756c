// The shared border extension against the table of border kinds, written out
// position by position.
#include <gtest/gtest.h>

#include <vector>

#include "filter/border.h"

namespace {

using zelcv::borderIndex;
using zelcv::extendRowBorder;

// Reference: walk from the edge one step at a time, reversing at each end.
int walkIndex(int i, int width, int kind) {
  if (i >= 0 && i < width) return i;
  if (kind == zelBorderReplicate) return i < 0 ? 0 : (i >= width ? width - 1 : i);
  if (kind == zelBorderWrap) {
    while (i < 0) i += width;
    while (i >= width) i -= width;
    return i;
  }
  bool repeatEdge = kind == zelBorderMirrorWithEdge;
  int pos = i < 0 ? 0 : width - 1;
  int dir = i < 0 ? 1 : -1;  // direction of the reflected walk
  int steps = i < 0 ? -i : i - (width - 1);
  if (repeatEdge) --steps;  // the first outside position repeats the edge
  for (int s = 0; s < steps; ++s) {
    if (pos + dir < 0 || pos + dir >= width) {
      dir = -dir;
      if (repeatEdge) continue;  // the turn itself repeats the end pixel
    }
    if (width > 1) pos += dir;
  }
  return pos;
}

TEST(Border, IndexMatchesAReflectedWalkForEveryKindAndWidth) {
  for (int kind : {zelBorderReplicate, zelBorderWrap, zelBorderMirror, zelBorderMirrorWithEdge})
    for (int width = 1; width <= 9; ++width)
      for (int i = -25; i < width + 25; ++i)
        ASSERT_EQ(borderIndex(i, width, kind), walkIndex(i, width, kind))
            << "kind " << kind << " width " << width << " position " << i;
}

TEST(Border, TableExamples) {
  // Left end of a row 0..4: -1, -2, -3.
  EXPECT_EQ(borderIndex(-1, 5, zelBorderReplicate), 0);
  EXPECT_EQ(borderIndex(-2, 5, zelBorderWrap), 3);
  EXPECT_EQ(borderIndex(-1, 5, zelBorderMirror), 1);
  EXPECT_EQ(borderIndex(-2, 5, zelBorderMirror), 2);
  EXPECT_EQ(borderIndex(-1, 5, zelBorderMirrorWithEdge), 0);
  EXPECT_EQ(borderIndex(-2, 5, zelBorderMirrorWithEdge), 1);
  EXPECT_EQ(borderIndex(5, 5, zelBorderMirror), 3);
  EXPECT_EQ(borderIndex(5, 5, zelBorderMirrorWithEdge), 4);
  EXPECT_EQ(borderIndex(-3, 1, zelBorderMirror), 0);
}

TEST(Border, ExtendsBothEndsWithFlagsOverridingTheKindPerSide) {
  // A row of 3 two-channel pixels with real neighbours around it in memory.
  std::vector<short> memory = {-9, -8, -7, -6, 10, 11, 20, 21, 30, 31, 40, 41, 50, 51};
  const short* row = memory.data() + 4;
  const short value[2] = {7, 8};
  std::vector<short> left(4, 0), right(4, 0);

  extendRowBorder<short>(row, 3, 2, zelBorderConstant, value, 2, 2, left.data(), right.data());
  EXPECT_EQ(left, (std::vector<short>{7, 8, 7, 8}));
  EXPECT_EQ(right, (std::vector<short>{7, 8, 7, 8}));

  extendRowBorder<short>(row, 3, 2, zelBorderMirror, value, 2, 2, left.data(), right.data());
  EXPECT_EQ(left, (std::vector<short>{30, 31, 20, 21}));   // positions -2, -1
  EXPECT_EQ(right, (std::vector<short>{20, 21, 10, 11}));  // positions 3, 4

  extendRowBorder<short>(row, 3, 2, zelBorderReplicate | zelBorderInMemLeft, value, 2, 2,
                         left.data(), right.data());
  EXPECT_EQ(left, (std::vector<short>{-9, -8, -7, -6}));  // read from memory
  EXPECT_EQ(right, (std::vector<short>{30, 31, 30, 31}));

  extendRowBorder<short>(row, 3, 2, zelBorderInMemory, value, 1, 2, left.data(), right.data());
  EXPECT_EQ(left[0], -7);
  EXPECT_EQ(left[1], -6);
  EXPECT_EQ(right, (std::vector<short>{40, 41, 50, 51}));

  // Kind 5 builds nothing.
  std::vector<short> untouched(4, 99);
  extendRowBorder<short>(row, 3, 2, 5, value, 2, 2, untouched.data(), untouched.data());
  EXPECT_EQ(untouched, std::vector<short>(4, 99));
}

}  // namespace
