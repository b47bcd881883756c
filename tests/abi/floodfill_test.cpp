// Every flood-fill member against a breadth-first reference over random
// images (flat regions, thin diagonal bridges, holes, regions on every edge,
// one-row, one-column and 1x1 images, padded steps, odd start addresses), the
// stack limit, and the record.
#include <gtest/gtest.h>

#include <cstring>
#include <random>

#include "abi/floodfill_reference.h"

namespace {

using zeltest::Criterion;
using zeltest::FillMember;
using zeltest::RefTest;
using zeltest::TestImage;

// A work buffer of exactly `bytes` at an odd address, with guard bytes after
// it, holding garbage on entry.
class GuardedBuffer {
 public:
  GuardedBuffer(int bytes, std::mt19937& rng) : bytes_(bytes), block_(size_t(bytes) + 64 + 8) {
    for (auto& b : block_) b = uint8_t(rng());
    offset_ = 1 + rng() % 7;
    for (size_t i = offset_ + bytes; i < block_.size(); ++i) block_[i] = 0x5A;
  }
  Zel8u* data() { return block_.data() + offset_; }
  bool guardIntact() const {
    for (size_t i = offset_ + bytes_; i < block_.size(); ++i)
      if (block_[i] != 0x5A) return false;
    return true;
  }

 private:
  int bytes_;
  std::vector<uint8_t> block_;
  size_t offset_;
};

int bufferBytes(Criterion c, ZeliSize roi) {
  int bytes = 0;
  const ZelStatus s = c == Criterion::Grad ? zeliFloodFillGetSize_Grad(roi, &bytes)
                                           : zeliFloodFillGetSize(roi, &bytes);
  EXPECT_EQ(s, zelStatusOk);
  return bytes;
}

// Values of a small palette, so that equal and near-equal pixels are common.
template <typename T>
T paletteValue(int index) {
  const T base = std::is_floating_point<T>::value ? T(-3.5) : T(10);
  const T stride = std::is_same<T, Zel16u>::value ? T(1000) : T(3);
  return T(base + stride * index);
}

// Flat regions of palette values, rectangles with holes, one-pixel diagonal
// lines (bridges for 8-connectivity only) and sparse noise. Gradient images
// add a gentle ramp so that regions drift away from the seed's value.
template <typename T>
void drawScene(TestImage<T>& im, std::mt19937& rng, bool ramp) {
  const int w = im.width(), h = im.height(), C = im.channels();
  auto uni = [&](int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); };
  auto put = [&](int x, int y, int idx) {
    for (int c = 0; c < C; ++c) im.at(x, y, c) = paletteValue<T>(idx + (c == 2 && uni(0, 9) == 0));
  };
  const int background = uni(0, 1);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) put(x, y, background);
  for (int n = uni(0, 6); n > 0; --n) {  // rectangles, some hollow
    const int x0 = uni(0, w - 1), y0 = uni(0, h - 1), x1 = uni(x0, w - 1), y1 = uni(y0, h - 1);
    const int idx = uni(0, 3);
    const bool hollow = uni(0, 1) == 1;
    for (int y = y0; y <= y1; ++y)
      for (int x = x0; x <= x1; ++x)
        if (!hollow || y == y0 || y == y1 || x == x0 || x == x1) put(x, y, idx);
  }
  for (int n = uni(0, 4); n > 0; --n) {  // diagonal one-pixel lines
    int x = uni(0, w - 1), y = uni(0, h - 1);
    const int dx = uni(0, 1) ? 1 : -1, idx = uni(0, 3);
    for (int len = uni(2, 40); len > 0 && x >= 0 && x < w && y < h; --len, x += dx, ++y) put(x, y, idx);
  }
  const int noise = uni(0, 3) == 0 ? 0 : uni(1, 12);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      if (uni(0, 99) < noise) put(x, y, uni(0, 3));
  if (ramp) {
    const int gx = uni(0, 2), gy = uni(0, 2);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x)
        for (int c = 0; c < C; ++c)
          im.at(x, y, c) = T(im.at(x, y, c) + ((x * gx + y * gy) % 7) * (std::is_same<T, Zel16u>::value ? 300 : 1));
  }
}

// Sizes: 1x1, one row, one column (from 12 rows, where the stack of a column
// cannot fill up), wide ones and random ones.
ZeliSize randomSize(std::mt19937& rng, int i) {
  auto uni = [&](int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); };
  switch (i % 8) {
    case 0: return {1, 1};
    case 1: return {uni(1, 70), 1};
    case 2: return {1, uni(12, 50)};
    case 3: return {uni(40, 200), uni(2, 24)};  // long runs for the 16-pixel paths
    default: return {uni(8, 48), uni(8, 40)};
  }
}

template <typename T>
void fillParams(std::mt19937& rng, const FillMember<T>& m, const TestImage<T>& im, ZeliPoint seed,
                RefTest<T>& t) {
  auto uni = [&](int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); };
  t.channels = m.channels;
  t.criterion = m.criterion;
  const T unit = std::is_same<T, Zel16u>::value ? T(500) : T(1);
  for (int c = 0; c < 3; ++c) {
    t.seed[c] = c < m.channels ? im.at(seed.x, seed.y, c) : T(0);
    // Occasionally the seed's own value (early exit) or a palette value.
    t.nv[c] = uni(0, 15) == 0 ? t.seed[c] : paletteValue<T>(uni(0, 5) + (m.criterion == Criterion::Range ? 8 : 0));
    if (m.criterion == Criterion::Grad && uni(0, 3) == 0) t.nv[c] = t.seed[c];
    t.minD[c] = T(unit * uni(0, 4));
    t.maxD[c] = T(unit * uni(0, 4));
  }
  // Range fills sometimes get a new value inside their interval.
  if (m.criterion == Criterion::Range && uni(0, 5) == 0)
    for (int c = 0; c < m.channels; ++c) t.nv[c] = T(t.seed[c] + (t.maxD[c] > 0 ? unit : T(0)));
}

template <typename T>
void compareWithReference(uint32_t seedValue, int rounds) {
  std::mt19937 rng(seedValue);
  for (const FillMember<T>& m : zeltest::fillMembers<T>()) {
    SCOPED_TRACE(m.name);
    int filled = 0;
    for (int i = 0; i < rounds; ++i) {
      const ZeliSize roi = randomSize(rng, i);
      zeltest::Layout layout = zeltest::randomLayout(rng, 1, 1, m.channels, sizeof(T), sizeof(T));
      layout.width = roi.width;
      layout.height = roi.height;
      TestImage<T> got(layout);
      drawScene(got, rng, m.criterion == Criterion::Grad);
      TestImage<T> want = zeltest::cloneImage(got);
      const ZeliPoint seed = {int(rng() % roi.width), int(rng() % roi.height)};
      RefTest<T> t;
      fillParams(rng, m, got, seed, t);
      SCOPED_TRACE(testing::Message() << roi.width << "x" << roi.height << " seed " << seed.x << ","
                                      << seed.y << " step " << got.step());
      const zeltest::RefResult ref = zeltest::referenceFill(want, seed, m.conn8, t);
      GuardedBuffer buffer(bufferBytes(m.criterion, roi), rng);
      ZeliConnectedComp region, before;
      std::memset(&region, 0x6B, sizeof region);
      before = region;
      ASSERT_EQ(m.call(got.data(), got.step(), roi, seed, t.nv, t.minD, t.maxD, &region, buffer.data()),
                zelStatusOk);
      ASSERT_TRUE(got.sentinelIntact());
      ASSERT_TRUE(buffer.guardIntact());
      ASSERT_TRUE(got.sameAs(want));
      if (!ref.filled) {
        EXPECT_EQ(std::memcmp(&region, &before, sizeof region), 0) << "record written on early exit";
        continue;
      }
      ++filled;
      EXPECT_EQ(region.area, double(ref.area));
      EXPECT_EQ(region.rect.x, ref.rect.x);
      EXPECT_EQ(region.rect.y, ref.rect.y);
      EXPECT_EQ(region.rect.width, ref.rect.width);
      EXPECT_EQ(region.rect.height, ref.rect.height);
      for (int c = 0; c < 3; ++c) EXPECT_EQ(region.value[c], c < m.channels ? double(t.nv[c]) : 0.0);
    }
    EXPECT_GT(filled, rounds / 2);
  }
}

TEST(FloodFill, Members8uMatchBreadthFirstReference) { compareWithReference<Zel8u>(7101, 160); }
TEST(FloodFill, Members16uMatchBreadthFirstReference) { compareWithReference<Zel16u>(7102, 120); }
TEST(FloodFill, Members32sMatchBreadthFirstReference) { compareWithReference<Zel32s>(7103, 160); }
TEST(FloodFill, Members32fMatchBreadthFirstReference) { compareWithReference<Zel32f>(7104, 120); }

// A one-column image whose seed sits in row 4 of 8: the stack holds 2
// entries, so the two runs found beside the seed fill it; the count restarts
// at 0 and the fill ends. The runs were painted when found, but only the
// seed's row was popped into the rectangle.
TEST(FloodFill, FullStackEndsPlainAndRangeFills) {
  std::mt19937 rng(7105);
  for (const FillMember<Zel8u>& m : zeltest::fillMembers<Zel8u>()) {
    if (m.criterion == Criterion::Grad || m.channels != 1) continue;
    SCOPED_TRACE(m.name);
    TestImage<Zel8u> im({1, 8, 1, 0, 0});
    for (int y = 0; y < 8; ++y) im.at(0, y) = 20;
    GuardedBuffer buffer(bufferBytes(m.criterion, im.size()), rng);
    ZeliConnectedComp region;
    const Zel8u nv = 99, d = 2;
    ASSERT_EQ(m.call(im.data(), im.step(), im.size(), {0, 4}, &nv, &d, &d, &region, buffer.data()), zelStatusOk);
    for (int y = 0; y < 8; ++y) EXPECT_EQ(im.at(0, y), (y >= 3 && y <= 5) ? 99 : 20) << y;
    EXPECT_EQ(region.area, 3.0);
    EXPECT_EQ(region.rect.y, 4);
    EXPECT_EQ(region.rect.height, 1);
    EXPECT_TRUE(buffer.guardIntact());
  }
}

// Images of 4 to 7 pixels hold one stack entry: only the seed's row is filled.
TEST(FloodFill, TinyImagesFillTheSeedRowOnly) {
  std::mt19937 rng(7106);
  const ZeliSize sizes[] = {{2, 2}, {2, 3}, {3, 2}, {1, 4}, {1, 7}, {2, 1}, {1, 3}};
  for (const FillMember<Zel16u>& m : zeltest::fillMembers<Zel16u>()) {
    if (m.criterion == Criterion::Grad) continue;
    for (ZeliSize roi : sizes) {
      SCOPED_TRACE(testing::Message() << m.name << " " << roi.width << "x" << roi.height);
      TestImage<Zel16u> im({roi.width, roi.height, m.channels, 2, 0});
      for (int y = 0; y < roi.height; ++y)
        for (int i = 0; i < roi.width * m.channels; ++i) im.row(y)[i] = 500;
      GuardedBuffer buffer(bufferBytes(m.criterion, roi), rng);
      ZeliConnectedComp region;
      const Zel16u nv[3] = {7, 8, 9}, d[3] = {0, 0, 0};
      const int sy = roi.height - 1;
      ASSERT_EQ(m.call(im.data(), im.step(), roi, {0, sy}, nv, d, d, &region, buffer.data()), zelStatusOk);
      for (int y = 0; y < roi.height; ++y)
        for (int x = 0; x < roi.width; ++x) EXPECT_EQ(im.at(x, y), y == sy ? 7 : 500) << x << "," << y;
      EXPECT_EQ(region.area, double(roi.width));
      EXPECT_EQ(region.rect.height, 1);
      EXPECT_EQ(region.rect.width, roi.width);
      EXPECT_TRUE(buffer.guardIntact());
    }
  }
}

// Random mazes whose fills may outgrow the stack: whatever is cut short, the
// fill stays inside the buffer, paints only pixels of the true region and
// counts exactly what it painted.
TEST(FloodFill, OutgrownStackStaysInsideBufferAndRegion) {
  std::mt19937 rng(7107);
  int cut = 0;
  for (const FillMember<Zel8u>& m : zeltest::fillMembers<Zel8u>()) {
    if (m.channels != 1) continue;
    SCOPED_TRACE(m.name);
    for (int i = 0; i < 60; ++i) {
      // Narrow images hold few stack entries.
      const ZeliSize roi = i % 2 ? ZeliSize{int(2 + rng() % 24), int(2 + rng() % 24)}
                                 : ZeliSize{int(1 + rng() % 3), int(2 + rng() % 24)};
      TestImage<Zel8u> im({roi.width, roi.height, 1, int(rng() % 3), 0});
      const int density = 30 + int(rng() % 30);
      for (int y = 0; y < roi.height; ++y)
        for (int x = 0; x < roi.width; ++x) im.at(x, y) = int(rng() % 100) < density ? 200 : 50;
      const ZeliPoint seed = {int(rng() % roi.width), int(rng() % roi.height)};
      im.at(seed.x, seed.y) = 50;
      TestImage<Zel8u> want = zeltest::cloneImage(im);
      RefTest<Zel8u> t{1, m.criterion, {50}, {51}, {1}, {0}};
      const zeltest::RefResult ref = zeltest::referenceFill(want, seed, m.conn8, t);
      GuardedBuffer buffer(bufferBytes(m.criterion, roi), rng);
      ZeliConnectedComp region;
      ASSERT_EQ(m.call(im.data(), im.step(), roi, seed, t.nv, t.minD, t.maxD, &region, buffer.data()),
                zelStatusOk);
      ASSERT_TRUE(buffer.guardIntact());
      ASSERT_TRUE(im.sentinelIntact());
      int painted = 0;
      for (int y = 0; y < roi.height; ++y)
        for (int x = 0; x < roi.width; ++x)
          if (im.at(x, y) == 51) {
            ++painted;
            ASSERT_EQ(want.at(x, y), 51) << x << "," << y;
          }
      EXPECT_EQ(region.area, double(painted));
      cut += painted < ref.area;
    }
  }
  EXPECT_GT(cut, 0) << "no fill outgrew its stack";
}

// The seed already holding the new value: plain and range members return at
// once and write nothing; gradient members fill anyway.
TEST(FloodFill, SeedEqualToNewValue) {
  std::mt19937 rng(7108);
  for (const FillMember<Zel32f>& m : zeltest::fillMembers<Zel32f>()) {
    SCOPED_TRACE(m.name);
    TestImage<Zel32f> im({9, 5, m.channels, 4, 4});
    im.fillRandom(rng, 0.0f, 2.0f);
    for (int x = 0; x < 9; ++x)
      for (int c = 0; c < m.channels; ++c) im.at(x, 2, c) = 1.5f;
    const TestImage<Zel32f> before = zeltest::cloneImage(im);
    GuardedBuffer buffer(bufferBytes(m.criterion, im.size()), rng);
    ZeliConnectedComp region, untouched;
    std::memset(&region, 0x3C, sizeof region);
    untouched = region;
    const Zel32f nv[3] = {1.5f, 1.5f, 1.5f}, d[3] = {0.0f, 0.0f, 0.0f};
    ASSERT_EQ(m.call(im.data(), im.step(), im.size(), {4, 2}, nv, d, d, &region, buffer.data()), zelStatusOk);
    EXPECT_TRUE(im.sameAs(before));
    if (m.criterion == Criterion::Grad) {
      EXPECT_EQ(region.area, 9.0);
      EXPECT_EQ(region.rect.x, 0);
      EXPECT_EQ(region.rect.width, 9);
      EXPECT_EQ(region.rect.y, 2);
      EXPECT_EQ(region.rect.height, 1);
    } else {
      EXPECT_EQ(std::memcmp(&region, &untouched, sizeof region), 0);
    }
  }
}

}  // namespace
