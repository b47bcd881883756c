// Flood fill: the buffer formulas, every argument check in its order with
// nothing written on failure, and the shapes that single out each part of
// the traversal (U-shapes, diagonal chains, a seed on the last row).
#include <gtest/gtest.h>

#include <cstring>
#include <random>

#include "abi/floodfill_reference.h"

namespace {

using zeltest::Criterion;
using zeltest::FillMember;
using zeltest::TestImage;

TEST(FloodFillChecks, SizeQueriesFollowTheFormulas) {
  const ZeliSize sizes[] = {{1, 1},         {3, 1},        {640, 480},      {1, 100000},  {18918, 18918},
                            {18919, 18919}, {11239, 11239}, {11240, 11240}, {INT32_MAX, 1}, {65536, 32768}};
  for (ZeliSize s : sizes) {
    SCOPED_TRACE(testing::Message() << s.width << "x" << s.height);
    const int64_t w = s.width, h = s.height;
    // Sizes an int cannot hold are refused, the output left alone.
    for (int grad = 0; grad < 2; ++grad) {
      const int64_t want = grad ? 48 * h * w / 3 + (w + 2) * (h + 2) + 64 : 24 * h * w / 4 + 32;
      int bytes = -1;
      const ZelStatus st = (grad ? zeliFloodFillGetSize_Grad : zeliFloodFillGetSize)(s, &bytes);
      EXPECT_EQ(st, want > INT32_MAX ? zelStatusBadSize : zelStatusOk) << grad;
      EXPECT_EQ(bytes, want > INT32_MAX ? -1 : int(want)) << grad;
    }
  }
  for (auto query : {zeliFloodFillGetSize, zeliFloodFillGetSize_Grad}) {
    int bytes = 77;
    EXPECT_EQ(query({0, 0}, nullptr), zelStatusNullPointer);
    EXPECT_EQ(query({0, 5}, &bytes), zelStatusBadSize);
    EXPECT_EQ(query({5, -1}, &bytes), zelStatusBadSize);
    EXPECT_EQ(bytes, 77);
  }
}

// Each failing argument in turn, earlier arguments valid and later ones bad
// as well where the order matters; image and record stay untouched.
template <typename T>
void checkOrder(const FillMember<T>& m) {
  SCOPED_TRACE(m.name);
  const int C = m.channels;
  TestImage<T> im({6, 4, C, int(sizeof(T)), 0});
  for (int y = 0; y < 4; ++y)
    for (int i = 0; i < 6 * C; ++i) im.row(y)[i] = T(1);
  const TestImage<T> before = zeltest::cloneImage(im);
  std::vector<Zel8u> buffer(4096);
  ZeliConnectedComp region, untouched;
  std::memset(&region, 0x11, sizeof region);
  untouched = region;
  const T nv[3] = {T(2), T(2), T(2)}, d[3] = {T(1), T(1), T(1)};
  const int step = im.step(), row = 6 * C * int(sizeof(T));
  const ZeliSize roi = im.size();
  const ZeliPoint seed = {2, 1};
  auto call = [&](T* image, int s, ZeliSize r, ZeliPoint p, const T* v, const T* lo, const T* hi,
                  ZeliConnectedComp* g, Zel8u* b) { return m.call(image, s, r, p, v, lo, hi, g, b); };
  Zel8u* buf = buffer.data();
  EXPECT_EQ(call(nullptr, 0, {0, 0}, {-1, -1}, nv, d, d, &region, buf), zelStatusNullPointer);
  EXPECT_EQ(call(im.data(), 0, {0, 0}, {-1, -1}, nv, d, d, nullptr, buf), zelStatusNullPointer);
  EXPECT_EQ(call(im.data(), 0, {0, 0}, {-1, -1}, nv, d, d, &region, nullptr), zelStatusNullPointer);
  if (C == 3) {
    EXPECT_EQ(call(im.data(), 0, {0, 0}, seed, nullptr, d, d, &region, buf), zelStatusNullPointer);
    if (m.criterion != Criterion::Plain) {
      EXPECT_EQ(call(im.data(), 0, {0, 0}, seed, nv, nullptr, d, &region, buf), zelStatusNullPointer);
      EXPECT_EQ(call(im.data(), 0, {0, 0}, seed, nv, d, nullptr, &region, buf), zelStatusNullPointer);
    }
  }
  EXPECT_EQ(call(im.data(), -1, {0, 4}, {-1, -1}, nv, d, d, &region, buf), zelStatusBadSize);
  EXPECT_EQ(call(im.data(), -1, {6, -3}, {-1, -1}, nv, d, d, &region, buf), zelStatusBadSize);
  EXPECT_EQ(call(im.data(), row - 1, roi, {-1, -1}, nv, d, d, &region, buf), zelStatusBadStep);
  EXPECT_EQ(call(im.data(), -row, roi, {-1, -1}, nv, d, d, &region, buf), zelStatusBadStep);
  // An odd step is fine for one-byte elements, misaligned for wider ones.
  const ZelStatus odd = call(im.data(), row + 1, {6, 3}, {-1, 0}, nv, d, d, &region, buf);
  EXPECT_EQ(odd, sizeof(T) == 1 ? zelStatusOutOfRange : zelStatusMisalignedStep);
  for (ZeliPoint p : {ZeliPoint{-1, 0}, ZeliPoint{6, 0}, ZeliPoint{0, -1}, ZeliPoint{0, 4}})
    EXPECT_EQ(call(im.data(), step, roi, p, nv, d, d, &region, buf), zelStatusOutOfRange);
  if (std::is_floating_point<T>::value) {
    const T neg[3] = {T(1), T(1), T(-0.5)};
    const T* bad = C == 3 ? neg : neg + 2;
    const ZelStatus want = m.criterion == Criterion::Grad ? zelStatusOutOfRange : zelStatusOk;
    EXPECT_EQ(call(im.data(), step, roi, seed, nv, bad, d, &region, buf), want);
    if (want == zelStatusOk) {  // undo the fill, then the other delta
      for (int y = 0; y < 4; ++y)
        for (int i = 0; i < 6 * C; ++i) im.row(y)[i] = T(1);
      std::memset(&region, 0x11, sizeof region);
    }
    EXPECT_EQ(call(im.data(), step, roi, seed, nv, d, bad, &region, buf), want);
    if (want == zelStatusOk) return;
  }
  EXPECT_TRUE(im.sameAs(before));
  EXPECT_EQ(std::memcmp(&region, &untouched, sizeof region), 0);
}

TEST(FloodFillChecks, CodesInOrderAndNothingWrittenOnFailure) {
  for (const auto& m : zeltest::fillMembers<Zel8u>()) checkOrder(m);
  for (const auto& m : zeltest::fillMembers<Zel16u>()) checkOrder(m);
  for (const auto& m : zeltest::fillMembers<Zel32s>()) checkOrder(m);
  for (const auto& m : zeltest::fillMembers<Zel32f>()) checkOrder(m);
}

// Draws a picture from text ('#' = 9, '.' = 1), fills from the seed marked
// by 's' (value 1) and returns the result as text ('*' = filled).
std::vector<std::string> fillPicture(const FillMember<Zel8u>& m, std::vector<std::string> pic) {
  const int w = int(pic[0].size()), h = int(pic.size());
  TestImage<Zel8u> im({w, h, m.channels, 3, 1});
  ZeliPoint seed = {0, 0};
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      if (pic[y][x] == 's') seed = {x, y};
      for (int c = 0; c < m.channels; ++c) im.at(x, y, c) = pic[y][x] == '#' ? 9 : 1;
    }
  int bytes = 0;
  (m.criterion == Criterion::Grad ? zeliFloodFillGetSize_Grad : zeliFloodFillGetSize)(im.size(), &bytes);
  std::vector<Zel8u> buffer(size_t(bytes) + 1);
  ZeliConnectedComp region;
  const Zel8u nv[3] = {5, 5, 5}, d[3] = {0, 0, 0};
  EXPECT_EQ(m.call(im.data(), im.step(), im.size(), seed, nv, d, d, &region, buffer.data() + 1), zelStatusOk);
  int area = 0;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      pic[y][x] = im.at(x, y) == 5 ? '*' : pic[y][x] == 's' ? '.' : pic[y][x];
      area += pic[y][x] == '*';
    }
  EXPECT_EQ(region.area, double(area));
  return pic;
}

TEST(FloodFillChecks, ShapesThatTestEachScan) {
  for (const FillMember<Zel8u>& m : zeltest::fillMembers<Zel8u>()) {
    SCOPED_TRACE(m.name);
    // A U whose arms join above the seed: found by the parent-row scan.
    EXPECT_EQ(fillPicture(m, {"..#...", ".##.#.", ".#..#.", ".####.", "...s.."}),
              (std::vector<std::string>{"**#***", "*##*#*", "*#**#*", "*####*", "******"}));
    // A diagonal chain: one pixel with 4-connectivity, all with 8.
    const std::vector<std::string> chain = {"s###", "#.##", "##.#", "###."};
    EXPECT_EQ(fillPicture(m, chain), m.conn8 ? (std::vector<std::string>{"*###", "#*##", "##*#", "###*"})
                                             : (std::vector<std::string>{"*###", "#.##", "##.#", "###."}));
    // A seed on the last row: the fill starts upwards and still reaches all.
    EXPECT_EQ(fillPicture(m, {".#.", "...", "#.s"}), (std::vector<std::string>{"*#*", "***", "#**"}));
  }
}

// 16u range bounds clamp at 0 and 65535 instead of wrapping (a wrapped
// bound would leave only the seed).
TEST(FloodFillChecks, RangeBoundsClampToTheType) {
  for (auto fn : {zeliFloodFill_Range4Con_16u_C1IR, zeliFloodFill_Range8Con_16u_C1IR}) {
    for (bool low : {true, false}) {
      TestImage<Zel16u> im({3, 1, 1, 0, 0});
      const Zel16u values[2][3] = {{10, 0, 65535}, {65535, 65000, 10}};
      for (int x = 0; x < 3; ++x) im.at(x, 0) = values[low ? 0 : 1][x];
      int bytes = 0;
      zeliFloodFillGetSize(im.size(), &bytes);
      std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
      ZeliConnectedComp region;
      const Zel16u minD = low ? 50 : 600, maxD = 50;
      ASSERT_EQ(fn(im.data(), im.step(), im.size(), {0, 0}, 7, minD, maxD, &region, buffer.data()), zelStatusOk);
      EXPECT_EQ(region.area, 2.0);
      EXPECT_EQ(im.at(1, 0), 7);
    }
  }
}

}  // namespace
