// Haar classifiers through the exported interface: random classifiers on
// random integrals compared window by window with a plain evaluation written
// from the header's contract; the rectangle geometry checked against pixel
// sums of real integrals; the checks and their order.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <vector>

#include "support/test_image.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::TestImage;

// A classifier description in the caller's terms.
template <typename W>
struct Cascade {
  std::vector<ZeliRect> rects;
  std::vector<W> weights;
  std::vector<Zel32f> thresholds, below, above;
  std::vector<int> counts;
  std::vector<Zel8u> tilted;
  int width = 0, height = 0;  // reach
};

template <typename W>
Cascade<W> randomCascade(std::mt19937& rng, bool withTilted) {
  Cascade<W> c;
  const int features = std::uniform_int_distribution<int>(1, 30)(rng);
  std::uniform_int_distribution<int> pos(0, 6), len(1, 5), rectCount(1, 4);
  std::uniform_real_distribution<float> value(-1.0f, 1.0f);
  for (int k = 0; k < features; ++k) {
    const bool tilt = withTilted && (rng() & 1);
    const int n = rectCount(rng);
    for (int r = 0; r < n; ++r) {
      ZeliRect q{pos(rng), pos(rng), len(rng), len(rng)};
      if (tilt) q.x += q.height;
      c.rects.push_back(q);
      c.width = std::max(c.width, q.x + q.width);
      c.height = std::max(c.height, q.y + q.height + (tilt ? q.width : 0));
      if constexpr (std::is_same<W, Zel32s>::value)
        c.weights.push_back(std::uniform_int_distribution<int>(-3, 3)(rng));
      else
        c.weights.push_back(value(rng) * 4.0f);
    }
    c.counts.push_back(n);
    c.thresholds.push_back(value(rng) * 20.0f);
    c.below.push_back(value(rng));
    c.above.push_back(value(rng));
    c.tilted.push_back(tilt ? 1 : 0);
  }
  return c;
}

// The plain evaluation of the contract: one window at a time.
inline float rectSum(const Zel32f* p, ptrdiff_t s, ZeliRect q, bool tilt) {
  auto at = [&](ptrdiff_t x, ptrdiff_t y) {
    Zel32f v;
    std::memcpy(&v, p + y * s + x, 4);
    return v;
  };
  if (!tilt) return (at(q.x + q.width, q.y + q.height) - at(q.x, q.y + q.height)) - (at(q.x + q.width, q.y) - at(q.x, q.y));
  return (at(q.x + q.width - q.height, q.y + q.width + q.height) - at(q.x - q.height, q.y + q.height)) -
         (at(q.x + q.width, q.y + q.width) - at(q.x, q.y));
}
inline uint32_t rectSum(const Zel32s* p, ptrdiff_t s, ZeliRect q, bool tilt) {
  auto at = [&](ptrdiff_t x, ptrdiff_t y) { return uint32_t(p[y * s + x]); };
  if (!tilt) return (at(q.x + q.width, q.y + q.height) - at(q.x, q.y + q.height)) - (at(q.x + q.width, q.y) - at(q.x, q.y));
  return (at(q.x + q.width - q.height, q.y + q.width + q.height) - at(q.x - q.height, q.y + q.height)) -
         (at(q.x + q.width, q.y + q.width) - at(q.x, q.y));
}

template <typename E, typename W>
float referenceSum(const Cascade<W>& c, const E* src, ptrdiff_t ss, const E* tilt, ptrdiff_t ts, float nv) {
  float sum = 0.0f;
  size_t r = 0;
  for (size_t k = 0; k < c.counts.size(); ++k) {
    const bool t = c.tilted[k] != 0;
    float f = 0.0f;
    uint32_t fi = 0;
    for (int i = 0; i < c.counts[k]; ++i, ++r) {
      if constexpr (std::is_same<E, Zel32f>::value) {
        const float product = c.weights[r] * rectSum(t ? tilt : src, t ? ts : ss, c.rects[r], t);
        f = i == 0 ? product : f + product;
      } else {
        fi += uint32_t(c.weights[r]) * rectSum(t ? tilt : src, t ? ts : ss, c.rects[r], t);
      }
    }
    if constexpr (!std::is_same<E, Zel32f>::value) f = float(int32_t(fi));
    const float bound = c.thresholds[k] * nv;
    sum = sum + (f < bound ? c.below[k] : c.above[k]);
  }
  return sum;
}

// The classifier calls of one element type.
struct Calls32f {
  using E = Zel32f;
  using W = Zel32f;
  using C = ZeliHaarClassifier_32f;
  static ZelStatus make(C** c, const Cascade<W>& d, bool tilted) {
    auto fn = tilted ? zeliTiltedHaarClassifierInitAlloc_32f : zeliHaarClassifierInitAlloc_32f;
    return fn(c, d.rects.data(), d.weights.data(), d.thresholds.data(), d.below.data(), d.above.data(),
              d.counts.data(), int(d.counts.size()));
  }
  static ZelStatus tilt(const Zel8u* m, C* c) { return zeliTiltHaarFeatures_32f(m, c); }
  static ZelStatus size(const C* c, ZeliSize* s) { return zeliGetHaarClassifierSize_32f(c, s); }
  static ZelStatus release(C* c) { return zeliHaarClassifierFree_32f(c); }
  static ZelStatus apply(const E* s, int ss, const Zel32f* n, int ns, Zel8u* m, int ms, ZeliSize roi, int* count,
                         float thr, const C* c) {
    return zeliApplyHaarClassifier_32f_C1R(s, ss, n, ns, m, ms, roi, count, thr, c);
  }
  static ZelStatus mixed(const E* s, int ss, const E* t, int ts, const Zel32f* n, int ns, Zel8u* m, int ms,
                         ZeliSize roi, int* count, float thr, const C* c) {
    return zeliApplyMixedHaarClassifier_32f_C1R(s, ss, t, ts, n, ns, m, ms, roi, count, thr, c);
  }
  static void fill(TestImage<E>& im, std::mt19937& rng) { im.fillRandom(rng, -300.0f, 300.0f); }
};

struct Calls32s {
  using E = Zel32s;
  using W = Zel32s;
  using C = ZeliHaarClassifier_32s;
  static ZelStatus make(C** c, const Cascade<W>& d, bool tilted) {
    auto fn = tilted ? zeliTiltedHaarClassifierInitAlloc_32s : zeliHaarClassifierInitAlloc_32s;
    return fn(c, d.rects.data(), d.weights.data(), d.thresholds.data(), d.below.data(), d.above.data(),
              d.counts.data(), int(d.counts.size()));
  }
  static ZelStatus tilt(const Zel8u* m, C* c) { return zeliTiltHaarFeatures_32s(m, c); }
  static ZelStatus size(const C* c, ZeliSize* s) { return zeliGetHaarClassifierSize_32s(c, s); }
  static ZelStatus release(C* c) { return zeliHaarClassifierFree_32s(c); }
  static ZelStatus apply(const E* s, int ss, const Zel32f* n, int ns, Zel8u* m, int ms, ZeliSize roi, int* count,
                         float thr, const C* c) {
    return zeliApplyHaarClassifier_32s32f_C1R(s, ss, n, ns, m, ms, roi, count, thr, c);
  }
  static ZelStatus mixed(const E* s, int ss, const E* t, int ts, const Zel32f* n, int ns, Zel8u* m, int ms,
                         ZeliSize roi, int* count, float thr, const C* c) {
    return zeliApplyMixedHaarClassifier_32s32f_C1R(s, ss, t, ts, n, ns, m, ms, roi, count, thr, c);
  }
  // Small values mostly; every fourth image spans the whole range, so that
  // the wrapping arithmetic is exercised.
  static void fill(TestImage<E>& im, std::mt19937& rng) {
    if (rng() % 4 == 0)
      im.fillRandom(rng, std::numeric_limits<int32_t>::min(), std::numeric_limits<int32_t>::max());
    else
      im.fillRandom(rng, -2000, 2000);
  }
};

template <typename Calls>
void compareWithReference(bool mixed, uint32_t seed) {
  using E = typename Calls::E;
  std::mt19937 rng(seed);
  for (int iteration = 0; iteration < 60; ++iteration) {
    SCOPED_TRACE(iteration);
    Cascade<typename Calls::W> d = randomCascade<typename Calls::W>(rng, mixed);
    typename Calls::C* c = nullptr;
    ASSERT_EQ(Calls::make(&c, d, false), zelStatusOk);
    if (mixed) {
      ASSERT_EQ(Calls::tilt(d.tilted.data(), c), zelStatusOk);
    }
    ZeliSize reach{};
    ASSERT_EQ(Calls::size(c, &reach), zelStatusOk);
    EXPECT_EQ(reach.width, d.width);
    EXPECT_EQ(reach.height, d.height);

    Layout windows = zeltest::randomLayout(rng, 70, 9, 1, 1, 1);
    const int w = windows.width, h = windows.height;
    auto layout = [&](int width, int height, int bytes) {
      Layout l;
      l.width = width;
      l.height = height;
      l.padBytes = bytes * int(rng() % 5);
      l.offsetBytes = bytes * int(rng() % (16 / bytes));
      return l;
    };
    TestImage<E> src(layout(w + reach.width, h + reach.height, 4));
    TestImage<E> tilt(layout(w + reach.width, h + reach.height, 4));
    TestImage<Zel32f> norm(layout(w, h, 4));
    TestImage<Zel8u> mask(windows);
    Calls::fill(src, rng);
    Calls::fill(tilt, rng);
    norm.fillRandom(rng, 0.0f, 3.0f);
    if (rng() % 3 == 0) norm.at(int(rng() % w), int(rng() % h)) = std::numeric_limits<float>::quiet_NaN();
    // Live windows: all, about half, or a few scattered ones.
    const int density = int(rng() % 3);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x)
        mask.at(x, y) = density == 0 ? 1 : density == 1 ? Zel8u(rng() % 2 * (1 + rng() % 255)) : Zel8u(rng() % 9 == 0 ? 7 : 0);

    // The stage threshold in the middle of the live windows' sums, so that
    // both decisions occur.
    std::vector<float> sums(size_t(w) * h);
    std::vector<float> live;
    const ptrdiff_t ss = src.step() / 4, ts = tilt.step() / 4;
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        const E* origin = src.row(y) + x;
        const E* torigin = mixed ? tilt.row(y) + x : origin;
        sums[size_t(y) * w + x] = referenceSum(d, origin, ss, torigin, mixed ? ts : ss, norm.at(x, y));
        if (mask.at(x, y)) live.push_back(sums[size_t(y) * w + x]);
      }
    float threshold = 0.0f;
    if (!live.empty()) {
      std::nth_element(live.begin(), live.begin() + live.size() / 2, live.end());
      threshold = live[live.size() / 2];
    }
    std::vector<Zel8u> expected;
    int expectedCount = 0;
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        Zel8u m = mask.at(x, y);
        if (m && sums[size_t(y) * w + x] < threshold) m = 0;
        expected.push_back(m);
        expectedCount += m != 0;
      }

    int count = -1;
    const ZelStatus s = mixed ? Calls::mixed(src.data(), src.step(), tilt.data(), tilt.step(), norm.data(),
                                             norm.step(), mask.data(), mask.step(), ZeliSize{w, h},
                                             &count, threshold, c)
                              : Calls::apply(src.data(), src.step(), norm.data(), norm.step(), mask.data(),
                                             mask.step(), ZeliSize{w, h}, &count, threshold, c);
    ASSERT_EQ(s, zelStatusOk);
    EXPECT_EQ(count, expectedCount);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) ASSERT_EQ(mask.at(x, y), expected[size_t(y) * w + x]) << x << "," << y;
    EXPECT_TRUE(mask.sentinelIntact());
    EXPECT_TRUE(src.sentinelIntact());
    ASSERT_EQ(Calls::release(c), zelStatusOk);
  }
}

TEST(HaarApply, UprightMatchesPlainEvaluation32f) { compareWithReference<Calls32f>(false, 11); }
TEST(HaarApply, UprightMatchesPlainEvaluation32s) { compareWithReference<Calls32s>(false, 12); }
TEST(HaarApply, MixedMatchesPlainEvaluation32f) { compareWithReference<Calls32f>(true, 13); }
TEST(HaarApply, MixedMatchesPlainEvaluation32s) { compareWithReference<Calls32s>(true, 14); }

// One feature of one rectangle with weight 1: a window is accepted exactly
// when the rectangle's pixel sum is below the feature threshold, so two
// thresholds half a unit around the brute-force sum pin the sum down. This
// ties the rectangle geometry to the integrals the library makes.
TEST(HaarApply, RectanglesSumTheirPixels) {
  std::mt19937 rng(5);
  for (int iteration = 0; iteration < 40; ++iteration) {
    SCOPED_TRACE(iteration);
    const int W = 16 + int(rng() % 10), H = 16 + int(rng() % 10);
    std::vector<Zel8u> image(size_t(W) * H);
    for (Zel8u& p : image) p = Zel8u(rng());
    std::vector<Zel32s> plain(size_t(W + 1) * (H + 1)), tilted(size_t(W + 2) * (H + 2));
    ASSERT_EQ(zeliIntegral_8u32s_C1R(image.data(), W, plain.data(), 4 * (W + 1), {W, H}, 0), zelStatusOk);
    ASSERT_EQ(zeliTiltedIntegral_8u32s_C1R(image.data(), W, tilted.data(), 4 * (W + 2), {W, H}, 0), zelStatusOk);
    const bool tilt = iteration % 2 == 1;
    ZeliRect q{int(rng() % 4), int(rng() % 4), 1 + int(rng() % 4), 1 + int(rng() % 4)};
    if (tilt) q.x += q.height;
    const int reachW = q.x + q.width, reachH = q.y + q.height + (tilt ? q.width : 0);
    // Windows over the part of the picture that every rectangle stays inside.
    const ZeliSize roi{W - reachW, H - reachH};
    ASSERT_GT(roi.width, 0);
    ASSERT_GT(roi.height, 0);
    std::vector<Zel32f> norm(size_t(roi.width) * roi.height, 1.0f);
    for (int side = 0; side < 2; ++side) {
      std::vector<Zel8u> mask(norm.size(), 1);
      std::vector<int64_t> sums(norm.size());
      for (int y = 0; y < roi.height; ++y)
        for (int x = 0; x < roi.width; ++x) {
          int64_t sum = 0;
          for (int r = 0; r < H; ++r)
            for (int cc = 0; cc < W; ++cc) {
              bool inside;
              if (!tilt) {
                inside = cc >= x + q.x && cc < x + q.x + q.width && r >= y + q.y && r < y + q.y + q.height;
              } else {
                const int tx = x + q.x, ty = y + q.y;
                inside = cc - r >= tx - ty - 2 * q.height + 1 && cc - r <= tx - ty && cc + r >= tx + ty - 1 &&
                         cc + r <= tx + ty + 2 * q.width - 2;
              }
              if (inside) sum += image[size_t(r) * W + cc];
            }
          sums[size_t(y) * roi.width + x] = sum;
        }
      // Each window gets its own threshold through its norm: t = 1, nv = sum +- 0.5.
      for (size_t i = 0; i < norm.size(); ++i) norm[i] = float(sums[i]) + (side ? 0.5f : -0.5f);
      Zel32s weight = 1;
      Zel32f t = 1.0f, below = 1.0f, above = 0.0f;
      int one = 1;
      ZeliHaarClassifier_32s* c = nullptr;
      auto make = tilt ? zeliTiltedHaarClassifierInitAlloc_32s : zeliHaarClassifierInitAlloc_32s;
      ASSERT_EQ(make(&c, &q, &weight, &t, &below, &above, &one, 1), zelStatusOk);
      int count = 0;
      const ZelStatus s = tilt ? zeliApplyMixedHaarClassifier_32s32f_C1R(
                                     plain.data(), 4 * (W + 1), tilted.data(), 4 * (W + 2), norm.data(),
                                     4 * roi.width, mask.data(), roi.width, roi, &count, 0.5f, c)
                               : zeliApplyHaarClassifier_32s32f_C1R(plain.data(), 4 * (W + 1), norm.data(),
                                                                    4 * roi.width, mask.data(), roi.width, roi,
                                                                    &count, 0.5f, c);
      ASSERT_EQ(s, zelStatusOk);
      // Below the upper bound: accepted everywhere; below the lower: nowhere.
      EXPECT_EQ(count, side ? int(mask.size()) : 0);
      ASSERT_EQ(zeliHaarClassifierFree_32s(c), zelStatusOk);
    }
  }
}

struct Fixture {
  ZeliRect rects[2] = {{0, 0, 2, 2}, {3, 1, 1, 3}};
  Zel32f weights[2] = {1.0f, -2.0f};
  Zel32f thresholds[2] = {0.0f, 1.0f};
  Zel32f below[2] = {1.0f, 0.5f};
  Zel32f above[2] = {-1.0f, 0.0f};
  int counts[2] = {1, 1};
};

TEST(HaarClassifier, BuildChecksAndSize) {
  Fixture f;
  ZeliHaarClassifier_32f* c = nullptr;
  EXPECT_EQ(zeliHaarClassifierInitAlloc_32f(nullptr, f.rects, f.weights, f.thresholds, f.below, f.above, f.counts, 2),
            zelStatusNullPointer);
  EXPECT_EQ(zeliHaarClassifierInitAlloc_32f(&c, f.rects, f.weights, f.thresholds, nullptr, f.above, f.counts, 2),
            zelStatusNullPointer);
  EXPECT_EQ(zeliHaarClassifierInitAlloc_32f(&c, f.rects, f.weights, f.thresholds, f.below, f.above, f.counts, 0),
            zelStatusBadSize);
  int zero[2] = {1, 0};
  EXPECT_EQ(zeliHaarClassifierInitAlloc_32f(&c, f.rects, f.weights, f.thresholds, f.below, f.above, zero, 2),
            zelStatusBadSize);
  ZeliRect bad[2] = {{0, 0, 2, 2}, {-1, 0, 1, 1}};
  EXPECT_EQ(zeliHaarClassifierInitAlloc_32f(&c, bad, f.weights, f.thresholds, f.below, f.above, f.counts, 2),
            zelStatusBadSize);
  // Tilted rectangles need x >= height: the first one has x 0.
  EXPECT_EQ(zeliTiltedHaarClassifierInitAlloc_32f(&c, f.rects, f.weights, f.thresholds, f.below, f.above, f.counts, 2),
            zelStatusBadSize);
  EXPECT_EQ(c, nullptr);

  ASSERT_EQ(zeliHaarClassifierInitAlloc_32f(&c, f.rects, f.weights, f.thresholds, f.below, f.above, f.counts, 2),
            zelStatusOk);
  ZeliSize size{};
  EXPECT_EQ(zeliGetHaarClassifierSize_32f(c, nullptr), zelStatusNullPointer);
  ASSERT_EQ(zeliGetHaarClassifierSize_32f(c, &size), zelStatusOk);
  EXPECT_EQ(size.width, 4);
  EXPECT_EQ(size.height, 4);
  // Tilting the first feature is refused (x 0 < height 2) and changes nothing.
  const Zel8u both[2] = {1, 1}, second[2] = {0, 1};
  EXPECT_EQ(zeliTiltHaarFeatures_32f(both, c), zelStatusBadSize);
  ASSERT_EQ(zeliGetHaarClassifierSize_32f(c, &size), zelStatusOk);
  EXPECT_EQ(size.height, 4);
  ASSERT_EQ(zeliTiltHaarFeatures_32f(second, c), zelStatusOk);
  ASSERT_EQ(zeliGetHaarClassifierSize_32f(c, &size), zelStatusOk);
  EXPECT_EQ(size.width, 4);
  EXPECT_EQ(size.height, 5);  // 1 + 1 + 3
  EXPECT_EQ(zeliHaarClassifierFree_32f(c), zelStatusOk);
  EXPECT_EQ(zeliHaarClassifierFree_32f(nullptr), zelStatusNullPointer);
}

TEST(HaarApply, ChecksInOrderAndWritesNothing) {
  Fixture f;
  ZeliHaarClassifier_32f* c = nullptr;
  ASSERT_EQ(zeliHaarClassifierInitAlloc_32f(&c, f.rects, f.weights, f.thresholds, f.below, f.above, f.counts, 2),
            zelStatusOk);
  const int w = 5, h = 3;  // the classifier reaches 4 x 4
  std::vector<Zel32f> src(size_t(w + 4) * (h + 4), 1.0f), norm(size_t(w) * h, 1.0f);
  std::vector<Zel8u> mask(size_t(w) * h, 9);
  const int ss = 4 * (w + 4), ns = 4 * w;
  int count = -5;
  auto call = [&](const Zel32f* s, int sStep, int nStep, int mStep, ZeliSize roi, int* n) {
    return zeliApplyHaarClassifier_32f_C1R(s, sStep, norm.data(), nStep, mask.data(), mStep, roi, n, 0.0f, c);
  };
  EXPECT_EQ(call(nullptr, 0, 0, 0, {0, 0}, &count), zelStatusNullPointer);
  EXPECT_EQ(call(src.data(), 0, 0, 0, {0, 0}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(call(src.data(), 0, 0, 0, {w, 0}, &count), zelStatusBadSize);
  EXPECT_EQ(call(src.data(), ss - 4, ns, w, {w, h}, &count), zelStatusBadStep);  // one column short of the reach
  EXPECT_EQ(call(src.data(), ss, ns, w - 1, {w, h}, &count), zelStatusBadStep);
  EXPECT_EQ(call(src.data(), ss + 2, ns, w, {w, h}, &count), zelStatusMisalignedStep);
  EXPECT_EQ(call(src.data(), ss, ns + 1, w + 1, {w, h}, &count), zelStatusMisalignedStep);
  // A classifier with a tilted feature needs the mixed form.
  const Zel8u second[2] = {0, 1};
  ASSERT_EQ(zeliTiltHaarFeatures_32f(second, c), zelStatusOk);
  ZeliSize reach{};
  ASSERT_EQ(zeliGetHaarClassifierSize_32f(c, &reach), zelStatusOk);
  std::vector<Zel32f> big(size_t(w + reach.width) * (h + reach.height), 1.0f);
  EXPECT_EQ(call(big.data(), 4 * (w + reach.width), ns, w, {w, h}, &count), zelStatusBadContext);
  EXPECT_EQ(count, -5);
  for (Zel8u m : mask) EXPECT_EQ(m, 9);
  int mixedCount = -1;
  EXPECT_EQ(zeliApplyMixedHaarClassifier_32f_C1R(big.data(), 4 * (w + reach.width), nullptr, 0, norm.data(), ns,
                                                 mask.data(), w, {w, h}, &mixedCount, 0.0f, c),
            zelStatusNullPointer);
  EXPECT_EQ(zeliApplyMixedHaarClassifier_32f_C1R(big.data(), 4 * (w + reach.width), big.data(),
                                                 4 * (w + reach.width) - 4, norm.data(), ns, mask.data(), w,
                                                 {w, h}, &mixedCount, 0.0f, c),
            zelStatusBadStep);
  EXPECT_EQ(zeliApplyMixedHaarClassifier_32f_C1R(big.data(), 4 * (w + reach.width), big.data(),
                                                 4 * (w + reach.width), norm.data(), ns, mask.data(), w, {w, h},
                                                 &mixedCount, 0.0f, c),
            zelStatusOk);
  EXPECT_GE(mixedCount, 0);
  ASSERT_EQ(zeliHaarClassifierFree_32f(c), zelStatusOk);

  // A 32s classifier object passed where a 32f one is expected is refused.
  ZeliHaarClassifier_32s* s = nullptr;
  Zel32s weights[2] = {1, -2};
  ASSERT_EQ(zeliHaarClassifierInitAlloc_32s(&s, f.rects, weights, f.thresholds, f.below, f.above, f.counts, 2),
            zelStatusOk);
  EXPECT_EQ(zeliApplyHaarClassifier_32f_C1R(src.data(), ss, norm.data(), ns, mask.data(), w, {w, h}, &count, 0.0f,
                                            reinterpret_cast<const ZeliHaarClassifier_32f*>(s)),
            zelStatusBadContext);
  ASSERT_EQ(zeliHaarClassifierFree_32s(s), zelStatusOk);
}

}  // namespace
