// Distance transforms against references taken from their definitions, over
// random sizes, steps, start offsets and feature images (sparse, dense, one
// feature pixel, none, features only on the border); the weight tables; the
// argument checks with their codes and order.
#include <gtest/gtest.h>

#include <array>
#include <cfloat>
#include <cmath>
#include <cstring>
#include <random>

#include "abi/distance_reference.h"
#include "abi/integral_reference.h"
#include "zelcv.h"

namespace {

using zeltest::exactLayout;
using zeltest::Features;
using zeltest::fillGarbage;
using zeltest::sameBits;
using zeltest::TestImage;

const Features kAllFeatures[] = {Features::Sparse, Features::Dense, Features::One, Features::None,
                                 Features::Border};

struct Case {
  int w, h;
  Features features;
};

// Every feature kind at thin and small sizes, then random ones up to 48.
std::vector<Case> sampleCases(std::mt19937& rng, int randomCount) {
  std::vector<Case> cases;
  for (Features f : kAllFeatures)
    for (auto s : {std::pair<int, int>{1, 1}, {1, 9}, {13, 1}, {2, 2}, {2, 7}, {37, 29}})
      cases.push_back({s.first, s.second, f});
  std::uniform_int_distribution<int> side(1, 48);
  for (int i = 0; i < randomCount; ++i) cases.push_back({side(rng), side(rng), kAllFeatures[rng() % 5]});
  return cases;
}

// The bytes of an image's rows, to show that a failed call wrote nothing.
template <typename T>
std::vector<uint8_t> snapshot(const TestImage<T>& img) {
  std::vector<uint8_t> bytes;
  for (int y = 0; y < img.height(); ++y) {
    const uint8_t* p = reinterpret_cast<const uint8_t*>(img.row(y));
    bytes.insert(bytes.end(), p, p + size_t(img.width()) * sizeof(T));
  }
  return bytes;
}

TestImage<uint8_t> featureImage(std::mt19937& rng, const Case& c) {
  TestImage<uint8_t> img(exactLayout(rng, c.w, c.h, 1, rng() % 2 == 0));
  zeltest::drawFeatures(img, c.features, rng);
  return img;
}

// Integer weight sets (a, b, c): the tables, random ones for which the two
// passes are exact (a <= b <= 2a, 2a <= c <= a + b), weights past saturation,
// and orthogonal steps dearer than diagonal ones.
std::vector<std::array<int, 3>> integerWeights(std::mt19937& rng) {
  std::vector<std::array<int, 3>> sets = {{1, 1, 2}, {1, 2, 3}, {2, 3, 5}, {5, 7, 11}, {40, 57, 90}, {300, 400, 650}, {20000, 30000, 45000}, {3, 2, 4}, {9, 2, 3}};
  for (int i = 0; i < 4; ++i) {
    const int a = std::uniform_int_distribution<int>(1, 30)(rng);
    const int b = std::uniform_int_distribution<int>(a, 2 * a)(rng);
    sets.push_back({a, b, std::uniform_int_distribution<int>(2 * a, a + b)(rng)});
  }
  return sets;
}

// The weights the passes use: a dearer orthogonal step counts as diagonal.
std::array<double, 3> effective(std::array<double, 3> wt, int w, int h) {
  if (wt[0] > wt[1] && w >= 2 && h >= 2) {
    wt[0] = wt[1];
    wt[2] = wt[1] + wt[1];
  }
  return wt;
}

template <typename T>
void checkIntegerResult(const TestImage<T>& got, const std::vector<double>& cost, double maxValue) {
  EXPECT_TRUE(sameBits(got, [&](int x, int y) { return T(std::min(maxValue, cost[size_t(y) * got.width() + x])); }));
}

TEST(DistanceChamfer, IntegerResultsAreTheCheapestPathCost) {
  std::mt19937 rng(701);
  const auto weights = integerWeights(rng);
  for (const Case& c : sampleCases(rng, 30)) {
    TestImage<uint8_t> src = featureImage(rng, c);
    for (int k : {3, 5}) {
      for (const auto& wt : weights) {
        SCOPED_TRACE(testing::Message() << c.w << " x " << c.h << " " << featuresName(c.features) << ", "
                                        << k << "x" << k << " weights " << wt[0] << " " << wt[1] << " " << wt[2]);
        const auto e = effective({double(wt[0]), double(wt[1]), double(wt[2])}, c.w, c.h);
        const std::vector<double> cost = zeltest::chamferPathCost(src, e[0], e[1], k == 5 ? e[2] : 0.0);
        const ZeliSize roi = {c.w, c.h};
        TestImage<Zel8u> d8(exactLayout(rng, c.w, c.h, 1, rng() % 2 == 0));
        TestImage<Zel16u> d16(exactLayout(rng, c.w, c.h, 2, rng() % 2 == 0));
        fillGarbage(d8, rng);
        fillGarbage(d16, rng);
        if (k == 3) {
          ASSERT_EQ(zeliDistanceTransform_3x3_8u_C1R(src.data(), src.step(), d8.data(), d8.step(), roi, wt.data()), 0);
          ASSERT_EQ(zeliDistanceTransform_3x3_8u16u_C1R(src.data(), src.step(), d16.data(), d16.step(), roi, wt.data()), 0);
        } else {
          ASSERT_EQ(zeliDistanceTransform_5x5_8u_C1R(src.data(), src.step(), d8.data(), d8.step(), roi, wt.data()), 0);
          ASSERT_EQ(zeliDistanceTransform_5x5_8u16u_C1R(src.data(), src.step(), d16.data(), d16.step(), roi, wt.data()), 0);
        }
        checkIntegerResult(d8, cost, 255);
        checkIntegerResult(d16, cost, 65535);

        // In place: the same bits as into a separate image.
        TestImage<Zel8u> inPlace(exactLayout(rng, c.w, c.h, 1, false));
        for (int y = 0; y < c.h; ++y) std::memcpy(inPlace.row(y), src.row(y), size_t(c.w));
        ASSERT_EQ((k == 3 ? zeliDistanceTransform_3x3_8u_C1IR : zeliDistanceTransform_5x5_8u_C1IR)(
                      inPlace.data(), inPlace.step(), roi, wt.data()),
                  0);
        EXPECT_TRUE(sameBits(inPlace, [&](int x, int y) { return d8.at(x, y); }));
        EXPECT_TRUE(src.sentinelIntact() && d8.sentinelIntact() && d16.sentinelIntact() && inPlace.sentinelIntact());
        if (HasFailure()) return;
      }
    }
  }
}

// The plain two passes in single precision, pixel by pixel, as documented.
std::vector<float> plainFloatPasses(const TestImage<uint8_t>& src, int k, std::array<float, 3> wt) {
  const int w = src.width(), h = src.height();
  if (wt[0] > wt[1] && w >= 2 && h >= 2) {
    wt[0] = wt[1];
    wt[2] = wt[1] + wt[1];
  }
  std::vector<float> d(size_t(w) * h);
  auto at = [&](int x, int y) -> float& { return d[size_t(y) * w + x]; };
  auto inside = [&](int x, int y) { return x >= 0 && y >= 0 && x < w && y < h; };
  struct Off {
    int dx, dy, wi;
  };
  std::vector<Off> half = {{-1, 0, 0}, {-1, -1, 1}, {0, -1, 0}, {1, -1, 1}};
  if (k == 5)
    for (Off o : {Off{-2, -1, 2}, Off{2, -1, 2}, Off{-1, -2, 2}, Off{1, -2, 2}}) half.push_back(o);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      float v = FLT_MAX;
      if (src.at(x, y) == 0) v = 0;
      else
        for (const Off& o : half)
          if (inside(x + o.dx, y + o.dy)) v = std::min(v, at(x + o.dx, y + o.dy) + wt[o.wi]);
      at(x, y) = v;
    }
  for (int y = h - 1; y >= 0; --y)
    for (int x = w - 1; x >= 0; --x) {
      float v = at(x, y);
      for (const Off& o : half)
        if (inside(x - o.dx, y - o.dy)) v = std::min(v, at(x - o.dx, y - o.dy) + wt[o.wi]);
      at(x, y) = v;
    }
  return d;
}

TEST(DistanceChamfer, FloatResultsFollowThePassesAndApproachThePathCost) {
  std::mt19937 rng(702);
  std::vector<std::array<float, 3>> weights = {{1.0f, 1.0f, 2.0f}, {1.0f, 2.0f, 3.0f}, {0.955f, 1.3693f, 2.1969f},
                                               {1.0f, 1.4f, 2.1969f}, {0.3f, 0.5f, 0.7f}, {3.5f, 1.25f, 2.0f}};
  for (const Case& c : sampleCases(rng, 30)) {
    TestImage<uint8_t> src = featureImage(rng, c);
    for (int k : {3, 5}) {
      for (const auto& wt : weights) {
        SCOPED_TRACE(testing::Message() << c.w << " x " << c.h << " " << featuresName(c.features) << ", "
                                        << k << "x" << k << " weights " << wt[0] << " " << wt[1] << " " << wt[2]);
        TestImage<Zel32f> dst(exactLayout(rng, c.w, c.h, 4, rng() % 2 == 0));
        fillGarbage(dst, rng);
        ASSERT_EQ((k == 3 ? zeliDistanceTransform_3x3_8u32f_C1R : zeliDistanceTransform_5x5_8u32f_C1R)(
                      src.data(), src.step(), dst.data(), dst.step(), {c.w, c.h}, wt.data()),
                  0);
        const std::vector<float> plain = plainFloatPasses(src, k, wt);
        EXPECT_TRUE(sameBits(dst, [&](int x, int y) { return plain[size_t(y) * c.w + x]; }));
        const auto e = effective({double(wt[0]), double(wt[1]), double(wt[2])}, c.w, c.h);
        const std::vector<double> cost = zeltest::chamferPathCost(src, e[0], e[1], k == 5 ? e[2] : 0.0);
        for (int y = 0; y < c.h; ++y)
          for (int x = 0; x < c.w; ++x) {
            const double want = cost[size_t(y) * c.w + x];
            if (std::isinf(want))
              EXPECT_EQ(dst.at(x, y), FLT_MAX);
            else
              EXPECT_NEAR(dst.at(x, y), want, 1e-5 * want) << "at " << x << ", " << y;
          }
        EXPECT_TRUE(dst.sentinelIntact());
        if (HasFailure()) return;
      }
    }
  }
}

// Long rows and images much larger than a vector block, where the scan's
// carried value decides: few features, rows that only the left or right
// neighbour can reach.
TEST(DistanceChamfer, WideRowsAndLongHorizontalRuns) {
  std::mt19937 rng(703);
  for (int w : {15, 16, 17, 31, 33, 64, 100, 257}) {
    const Case c = {w, 5, Features::One};
    TestImage<uint8_t> src = featureImage(rng, c);
    for (int y = 0; y < c.h; ++y)
      for (int x = 0; x < w; ++x) src.at(x, y) = 1;
    src.at(std::uniform_int_distribution<int>(0, w - 1)(rng), 2) = 0;
    if (w > 50) src.at(w - 1, 4) = 0;
    for (const std::array<int, 3> wt : {std::array<int, 3>{1, 1, 2}, {1, 2, 3}, {3, 4, 7}}) {
      SCOPED_TRACE(testing::Message() << "width " << w << " weights " << wt[0] << " " << wt[1]);
      const std::vector<double> cost = zeltest::chamferPathCost(src, wt[0], wt[1], wt[2]);
      TestImage<Zel16u> d16(exactLayout(rng, w, c.h, 2, true));
      TestImage<Zel8u> d8(exactLayout(rng, w, c.h, 1, true));
      ASSERT_EQ(zeliDistanceTransform_5x5_8u16u_C1R(src.data(), src.step(), d16.data(), d16.step(), {w, c.h}, wt.data()), 0);
      ASSERT_EQ(zeliDistanceTransform_5x5_8u_C1R(src.data(), src.step(), d8.data(), d8.step(), {w, c.h}, wt.data()), 0);
      checkIntegerResult(d16, cost, 65535);
      checkIntegerResult(d8, cost, 255);
      const std::array<float, 3> fw = {float(wt[0]) * 0.7f, float(wt[1]) * 0.7f, float(wt[2]) * 0.7f};
      TestImage<Zel32f> df(exactLayout(rng, w, c.h, 4, true));
      ASSERT_EQ(zeliDistanceTransform_5x5_8u32f_C1R(src.data(), src.step(), df.data(), df.step(), {w, c.h}, fw.data()), 0);
      const std::vector<float> plain = plainFloatPasses(src, 5, fw);
      EXPECT_TRUE(sameBits(df, [&](int x, int y) { return plain[size_t(y) * w + x]; }));
    }
  }
}

// The knight step: with 5x5 weights (5, 7, 11), (2, 1) costs 11 rather than
// the 12 of an orthogonal plus a diagonal step, which the 3x3 mask gives.
TEST(DistanceChamfer, KnightStepAndSimpleNorms) {
  TestImage<uint8_t> src({7, 6, 1, 3, 5});
  for (int y = 0; y < 6; ++y) std::memset(src.row(y), 9, 7);
  src.at(0, 0) = 0;
  TestImage<Zel16u> d(zeltest::Layout{7, 6, 1, 2, 2});
  const Zel32s w5[3] = {5, 7, 11}, chess[2] = {1, 1}, city[2] = {1, 2};
  ASSERT_EQ(zeliDistanceTransform_5x5_8u16u_C1R(src.data(), src.step(), d.data(), d.step(), {7, 6}, w5), 0);
  EXPECT_EQ(d.at(2, 1), 11);
  EXPECT_EQ(d.at(1, 2), 11);
  EXPECT_EQ(d.at(4, 2), 22);
  ASSERT_EQ(zeliDistanceTransform_3x3_8u16u_C1R(src.data(), src.step(), d.data(), d.step(), {7, 6}, w5), 0);
  EXPECT_EQ(d.at(2, 1), 12);
  ASSERT_EQ(zeliDistanceTransform_3x3_8u16u_C1R(src.data(), src.step(), d.data(), d.step(), {7, 6}, chess), 0);
  EXPECT_TRUE(sameBits(d, [](int x, int y) { return Zel16u(std::max(x, y)); }));
  ASSERT_EQ(zeliDistanceTransform_3x3_8u16u_C1R(src.data(), src.step(), d.data(), d.step(), {7, 6}, city), 0);
  EXPECT_TRUE(sameBits(d, [](int x, int y) { return Zel16u(x + y); }));
  EXPECT_TRUE(d.sentinelIntact());
}

TEST(DistanceChamfer, ChecksInOrderAndWriteNothing) {
  TestImage<uint8_t> src({8, 4, 1, 0, 0});
  TestImage<Zel8u> d8({8, 4, 1, 0, 0});
  TestImage<Zel16u> d16({8, 4, 1, 0, 0});
  TestImage<Zel32f> df({8, 4, 1, 0, 0});
  std::memset(d8.data(), 77, size_t(d8.step()) * 4);
  std::memset(d16.data(), 77, size_t(d16.step()) * 4);
  std::memset(df.data(), 77, size_t(df.step()) * 4);
  const std::vector<uint8_t> d8Before = snapshot(d8), d16Before = snapshot(d16), dfBefore = snapshot(df);
  const Zel32s good[3] = {1, 1, 1}, zeroA[3] = {0, 1, 1}, zeroB[3] = {1, 0, 1}, zeroC[3] = {1, 1, 0};
  const Zel32f fgood[3] = {1, 1, 1}, fzero[3] = {1, 0.0f, 1}, fneg[3] = {1, 1, -1.0f}, fnan[3] = {NAN, 1, 1};
  const ZeliSize roi = {8, 4};
  using F8 = decltype(&zeliDistanceTransform_3x3_8u_C1R);
  for (F8 f : {zeliDistanceTransform_3x3_8u_C1R, zeliDistanceTransform_5x5_8u_C1R}) {
    const bool five = f == zeliDistanceTransform_5x5_8u_C1R;
    EXPECT_EQ(f(nullptr, 8, d8.data(), 8, {0, 4}, good), zelStatusNullPointer);
    EXPECT_EQ(f(src.data(), 8, nullptr, 8, roi, good), zelStatusNullPointer);
    EXPECT_EQ(f(src.data(), 8, d8.data(), 8, roi, nullptr), zelStatusNullPointer);
    EXPECT_EQ(f(src.data(), 8, d8.data(), 8, {8, 0}, zeroA), zelStatusBadSize);
    EXPECT_EQ(f(src.data(), 7, d8.data(), 8, roi, zeroA), zelStatusBadStep);
    EXPECT_EQ(f(src.data(), 8, d8.data(), 7, roi, zeroA), zelStatusBadStep);
    EXPECT_EQ(f(src.data(), 8, d8.data(), 8, roi, zeroA), zelStatusBadMetrics);
    EXPECT_EQ(f(src.data(), 8, d8.data(), 8, roi, zeroB), zelStatusBadMetrics);
    EXPECT_EQ(f(src.data(), 8, d8.data(), 8, roi, zeroC), five ? zelStatusBadMetrics : zelStatusOk);
    if (!five) std::memset(d8.data(), 77, size_t(d8.step()) * 4);
  }
  EXPECT_EQ(zeliDistanceTransform_3x3_8u_C1IR(nullptr, 8, roi, good), zelStatusNullPointer);
  EXPECT_EQ(zeliDistanceTransform_5x5_8u_C1IR(d8.data(), 7, roi, good), zelStatusBadStep);
  EXPECT_EQ(zeliDistanceTransform_5x5_8u_C1IR(d8.data(), 8, roi, zeroC), zelStatusBadMetrics);
  for (auto f : {zeliDistanceTransform_3x3_8u16u_C1R, zeliDistanceTransform_5x5_8u16u_C1R}) {
    EXPECT_EQ(f(src.data(), 8, d16.data(), 16, roi, nullptr), zelStatusNullPointer);
    EXPECT_EQ(f(src.data(), 8, d16.data(), 15, {-1, 4}, zeroA), zelStatusBadSize);
    EXPECT_EQ(f(src.data(), 8, d16.data(), 15, roi, zeroA), zelStatusBadStep);
    EXPECT_EQ(f(src.data(), 7, d16.data(), 17, roi, zeroA), zelStatusBadStep);
    EXPECT_EQ(f(src.data(), 9, d16.data(), 17, roi, zeroA), zelStatusMisalignedStep);
    EXPECT_EQ(f(src.data(), 9, d16.data(), 16, roi, zeroB), zelStatusBadMetrics);
  }
  for (auto f : {zeliDistanceTransform_3x3_8u32f_C1R, zeliDistanceTransform_5x5_8u32f_C1R}) {
    EXPECT_EQ(f(src.data(), 8, df.data(), 32, roi, nullptr), zelStatusNullPointer);
    EXPECT_EQ(f(src.data(), 8, df.data(), 31, roi, fzero), zelStatusBadStep);
    EXPECT_EQ(f(src.data(), 8, df.data(), 34, roi, fzero), zelStatusMisalignedStep);
    EXPECT_EQ(f(src.data(), 8, df.data(), 32, roi, fzero), zelStatusBadMetrics);
    EXPECT_EQ(f(src.data(), 8, df.data(), 32, roi, fnan), zelStatusBadMetrics);
  }
  EXPECT_EQ(zeliDistanceTransform_3x3_8u32f_C1R(src.data(), 8, df.data(), 32, roi, fneg), zelStatusOk);
  std::memset(df.data(), 77, size_t(df.step()) * 4);
  EXPECT_EQ(zeliDistanceTransform_5x5_8u32f_C1R(src.data(), 8, df.data(), 32, roi, fneg), zelStatusBadMetrics);
  (void)fgood;
  EXPECT_TRUE(snapshot(d8) == d8Before && snapshot(d16) == d16Before && snapshot(df) == dfBefore);
}

TEST(DistanceMask, TablesAndChecks) {
  Zel32s i[3] = {-1, -1, -1};
  Zel32f f[3] = {-1, -1, -1};
  const Zel32s want32s[2][3][3] = {{{1, 1}, {1, 2}, {2, 3}}, {{1, 1, 2}, {1, 2, 3}, {5, 7, 11}}};
  const Zel32f want32f[2][3][3] = {{{1.0f, 1.0f}, {1.0f, 2.0f}, {0.955f, 1.3693f}},
                                   {{1.0f, 1.0f, 2.0f}, {1.0f, 2.0f, 3.0f}, {1.0f, 1.4f, 2.1969f}}};
  for (int k : {3, 5})
    for (int norm = 0; norm < 3; ++norm) {
      SCOPED_TRACE(testing::Message() << k << ", " << norm);
      const int n = k == 3 ? 2 : 3;
      Zel32s gi[4] = {-1, -1, -1, -1};
      Zel32f gf[4] = {-1, -1, -1, -1}, old[4] = {-1, -1, -1, -1};
      ASSERT_EQ(zeliGetDistanceTransformMask_32s(k, norm, gi), 0);
      ASSERT_EQ(zeliGetDistanceTransformMask_32f(k, norm, gf), 0);
      ASSERT_EQ(zeliGetDistanceTransformMask(10 * k + norm, old), 0);
      for (int j = 0; j < n; ++j) {
        EXPECT_EQ(gi[j], want32s[k == 5][norm][j]);
        EXPECT_EQ(gf[j], want32f[k == 5][norm][j]);
        EXPECT_EQ(old[j], want32f[k == 5][norm][j]);
      }
      EXPECT_EQ(gi[n], -1);  // nothing beyond the set's weights
      EXPECT_EQ(gf[n], -1.0f);
    }
  EXPECT_EQ(zeliGetDistanceTransformMask_32s(4, 7, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliGetDistanceTransformMask_32s(4, 7, i), zelStatusBadSize);
  EXPECT_EQ(zeliGetDistanceTransformMask_32f(0, 1, f), zelStatusBadSize);
  EXPECT_EQ(zeliGetDistanceTransformMask_32s(3, 3, i), zelStatusBadArgument);
  EXPECT_EQ(zeliGetDistanceTransformMask_32f(5, -1, f), zelStatusBadArgument);
  EXPECT_EQ(zeliGetDistanceTransformMask(31, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliGetDistanceTransformMask(33, f), zelStatusBadArgument);
  EXPECT_EQ(zeliGetDistanceTransformMask(-31, f), zelStatusBadArgument);
  EXPECT_EQ(zeliGetDistanceTransformMask(42, f), zelStatusBadSize);
  EXPECT_EQ(i[0], -1);
  EXPECT_EQ(f[0], -1.0f);
}

TEST(TrueDistance, ExactEuclideanDistances) {
  std::mt19937 rng(704);
  std::vector<Case> cases = sampleCases(rng, 40);
  for (Features f : kAllFeatures) cases.push_back({std::uniform_int_distribution<int>(100, 300)(rng), 131, f});
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << c.w << " x " << c.h << " " << featuresName(c.features));
    TestImage<uint8_t> src = featureImage(rng, c);
    const std::vector<int64_t> d2 = zeltest::squaredDistances(src);
    int size = -1;
    ASSERT_EQ(zeliTrueDistanceTransformGetBufferSize_8u32f_C1R({c.w, c.h}, &size), 0);
    const int n = std::max((c.w + 3) / 4 * 4, (c.h + 3) / 4 * 4);
    ASSERT_EQ(size, 24 * n + 56);
    std::vector<Zel8u> buffer(size_t(size) + 1);
    TestImage<Zel32f> dst(exactLayout(rng, c.w, c.h, 4, rng() % 2 == 0));
    fillGarbage(dst, rng);
    ASSERT_EQ(zeliTrueDistanceTransform_8u32f_C1R(src.data(), src.step(), dst.data(), dst.step(), {c.w, c.h},
                                                  buffer.data() + rng() % 2),
              0);
    EXPECT_TRUE(sameBits(dst, [&](int x, int y) {
      const int64_t v = d2[size_t(y) * c.w + x];
      return v < 0 ? FLT_MAX : float(std::sqrt(double(v)));
    }));
    EXPECT_TRUE(dst.sentinelIntact());
  }
}

// Squares past 2^24 take the double-precision root; rows past 2^20 pixels
// the breakpoints in double precision.
TEST(TrueDistance, LongDistances) {
  std::mt19937 rng(707);
  for (auto dims : {std::pair<int, int>{3, 4300}, {4200, 2}, {(1 << 20) + 37, 1}}) {
    const int w = dims.first, h = dims.second;
    TestImage<uint8_t> src({w, h, 1, 0, 0});
    for (int y = 0; y < h; ++y) std::memset(src.row(y), 1, size_t(w));
    src.at(0, 0) = 0;
    if (w > (1 << 20)) src.at(w - 1000, 0) = src.at(w / 3, 0) = 0;
    int size = 0;
    ASSERT_EQ(zeliTrueDistanceTransformGetBufferSize_8u32f_C1R({w, h}, &size), 0);
    std::vector<Zel8u> buffer(static_cast<size_t>(size));
    TestImage<Zel32f> dst(exactLayout(rng, w, h, 4, false));
    ASSERT_EQ(zeliTrueDistanceTransform_8u32f_C1R(src.data(), src.step(), dst.data(), dst.step(), {w, h}, buffer.data()), 0);
    const std::vector<int64_t> d2 = zeltest::squaredDistances(src);
    EXPECT_TRUE(sameBits(dst, [&](int x, int y) { return float(std::sqrt(double(d2[size_t(y) * w + x]))); }));
    EXPECT_TRUE(dst.sentinelIntact());
  }
}

TEST(TrueDistance, ChecksInOrder) {
  TestImage<uint8_t> src({8, 4, 1, 0, 0});
  TestImage<Zel32f> dst({8, 4, 1, 0, 0});
  std::memset(dst.data(), 77, size_t(dst.step()) * 4);
  const std::vector<uint8_t> before = snapshot(dst);
  std::vector<Zel8u> buf(1000);
  int size = 5;
  EXPECT_EQ(zeliTrueDistanceTransformGetBufferSize_8u32f_C1R({0, 4}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliTrueDistanceTransformGetBufferSize_8u32f_C1R({0, 4}, &size), zelStatusBadSize);
  EXPECT_EQ(zeliTrueDistanceTransformGetBufferSize_8u32f_C1R({4, -2}, &size), zelStatusBadSize);
  EXPECT_EQ(size, 5);
  EXPECT_EQ(zeliTrueDistanceTransform_8u32f_C1R(src.data(), 8, dst.data(), 32, {8, 4}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliTrueDistanceTransform_8u32f_C1R(nullptr, 8, dst.data(), 32, {0, 4}, buf.data()), zelStatusNullPointer);
  EXPECT_EQ(zeliTrueDistanceTransform_8u32f_C1R(src.data(), 8, dst.data(), 31, {8, 0}, buf.data()), zelStatusBadSize);
  EXPECT_EQ(zeliTrueDistanceTransform_8u32f_C1R(src.data(), 7, dst.data(), 34, {8, 4}, buf.data()), zelStatusBadStep);
  EXPECT_EQ(zeliTrueDistanceTransform_8u32f_C1R(src.data(), 8, dst.data(), 31, {8, 4}, buf.data()), zelStatusBadStep);
  EXPECT_EQ(zeliTrueDistanceTransform_8u32f_C1R(src.data(), 9, dst.data(), 34, {8, 4}, buf.data()), zelStatusMisalignedStep);
  EXPECT_TRUE(snapshot(dst) == before);
}

TEST(FastMarching, SweepsReachTheUpwindSolution) {
  std::mt19937 rng(705);
  for (const Case& c : sampleCases(rng, 30)) {
    TestImage<uint8_t> src = featureImage(rng, c);
    for (float r : {0.0f, 2.5f, 1000.0f}) {
      SCOPED_TRACE(testing::Message() << c.w << " x " << c.h << " " << featuresName(c.features) << ", radius " << r);
      int size = -1;
      ASSERT_EQ(zeliFastMarchingGetBufferSize_8u32f_C1R({c.w, c.h}, &size), 0);
      ASSERT_EQ(size, (c.h + 34) * (((c.w + 31) / 32 * 32) | 5) + 40);
      std::vector<Zel8u> buffer(static_cast<size_t>(size));
      TestImage<Zel32f> dst(exactLayout(rng, c.w, c.h, 4, rng() % 2 == 0));
      fillGarbage(dst, rng);
      ASSERT_EQ(zeliFastMarching_8u32f_C1R(src.data(), src.step(), dst.data(), dst.step(), {c.w, c.h}, r, buffer.data()), 0);
      const std::vector<float> want = zeltest::eikonalReference(src, r);
      for (int y = 0; y < c.h; ++y)
        for (int x = 0; x < c.w; ++x) {
          const float got = dst.at(x, y), v = want[size_t(y) * c.w + x];
          ASSERT_NEAR(got, v, 1e-4f * std::max(1.0f, std::fabs(v))) << "at " << x << ", " << y;
          ASSERT_LE(std::fabs(got), r);
          if (r == 0.0f) {
            ASSERT_EQ(std::signbit(got), std::signbit(v)) << "at " << x << ", " << y;
          }
        }
      EXPECT_TRUE(dst.sentinelIntact());
    }
  }
}

// Against the exact distance to the boundary pixels: the first-order scheme
// stays within a bounded fraction of it.
TEST(FastMarching, CloseToTheEuclideanDistance) {
  std::mt19937 rng(706);
  for (int trial = 0; trial < 12; ++trial) {
    const int w = std::uniform_int_distribution<int>(20, 90)(rng), h = std::uniform_int_distribution<int>(20, 90)(rng);
    TestImage<uint8_t> src({w, h, 1, 0, 0});
    for (int y = 0; y < h; ++y) std::memset(src.row(y), 1, size_t(w));
    // A few discs and rectangles of 0 pixels.
    for (int s = 0; s < 3; ++s) {
      const int cx = rng() % w, cy = rng() % h, rad = 2 + rng() % 8;
      for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x)
          if ((x - cx) * (x - cx) + (y - cy) * (y - cy) <= rad * rad) src.at(x, y) = 0;
    }
    // The boundary pixels and their exact distances.
    TestImage<uint8_t> boundary({w, h, 1, 0, 0});
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        bool b = false;
        if (src.at(x, y) == 0)
          for (auto d : {std::pair<int, int>{-1, 0}, {1, 0}, {0, -1}, {0, 1}}) {
            const int nx = x + d.first, ny = y + d.second;
            if (nx >= 0 && ny >= 0 && nx < w && ny < h && src.at(nx, ny) != 0) b = true;
          }
        boundary.at(x, y) = b ? 0 : 1;
      }
    const std::vector<int64_t> d2 = zeltest::squaredDistances(boundary);
    double worst = 0;
    int size = 0;
    ASSERT_EQ(zeliFastMarchingGetBufferSize_8u32f_C1R({w, h}, &size), 0);
    std::vector<Zel8u> buffer(static_cast<size_t>(size));
    TestImage<Zel32f> dst({w, h, 1, 0, 0});
    ASSERT_EQ(zeliFastMarching_8u32f_C1R(src.data(), src.step(), dst.data(), dst.step(), {w, h}, 1e6f, buffer.data()), 0);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        const int64_t e2 = d2[size_t(y) * w + x];
        if (e2 < 0) continue;
        const double exact = std::sqrt(double(e2)), got = std::fabs(dst.at(x, y));
        worst = std::max(worst, std::fabs(got - exact) / std::max(1.0, exact));
        ASSERT_NEAR(got, exact, 0.1 * exact + 0.35) << "at " << x << ", " << y;
        ASSERT_EQ(dst.at(x, y) < 0, src.at(x, y) == 0 && e2 > 0);
      }
    EXPECT_LT(worst, 0.3);  // the diagonal neighbour of a boundary pixel: 1 + 1/sqrt(2) - sqrt(2)
  }
}

TEST(FastMarching, ChecksInOrder) {
  TestImage<uint8_t> src({8, 4, 1, 0, 0});
  TestImage<Zel32f> dst({8, 4, 1, 0, 0});
  std::memset(dst.data(), 77, size_t(dst.step()) * 4);
  const std::vector<uint8_t> before = snapshot(dst);
  std::vector<Zel8u> buf(4000);
  int size = 5;
  EXPECT_EQ(zeliFastMarchingGetBufferSize_8u32f_C1R({0, 0}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliFastMarchingGetBufferSize_8u32f_C1R({0, 4}, &size), zelStatusBadSize);
  EXPECT_EQ(size, 5);
  EXPECT_EQ(zeliFastMarching_8u32f_C1R(src.data(), 8, dst.data(), 32, {8, 4}, 1.0f, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliFastMarching_8u32f_C1R(src.data(), 8, dst.data(), 32, {8, -4}, -1.0f, buf.data()), zelStatusBadSize);
  EXPECT_EQ(zeliFastMarching_8u32f_C1R(src.data(), 7, dst.data(), 32, {8, 4}, -1.0f, buf.data()), zelStatusBadStep);
  EXPECT_EQ(zeliFastMarching_8u32f_C1R(src.data(), 8, dst.data(), 30, {8, 4}, -1.0f, buf.data()), zelStatusBadStep);
  EXPECT_EQ(zeliFastMarching_8u32f_C1R(src.data(), 8, dst.data(), 34, {8, 4}, -1.0f, buf.data()), zelStatusMisalignedStep);
  EXPECT_EQ(zeliFastMarching_8u32f_C1R(src.data(), 8, dst.data(), 32, {8, 4}, -1.0f, buf.data()), zelStatusBadArgument);
  EXPECT_EQ(zeliFastMarching_8u32f_C1R(src.data(), 8, dst.data(), 32, {8, 4}, NAN, buf.data()), zelStatusBadArgument);
  EXPECT_TRUE(snapshot(dst) == before);
}

}  // namespace
