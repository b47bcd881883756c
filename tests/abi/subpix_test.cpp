// Sub-pixel window copies, line sampling, channel weighting, the fast
// arctangent and the motion-history update against their definitions, over
// random sizes, steps, offsets and positions (inside, across the border,
// far outside), bit for bit.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>

#include "abi/statistics_reference.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::randomLayout;
using zeltest::TestImage;

template <typename S, typename D>
using CopyFn = ZelStatus(ZELCV_CALL*)(const S*, int, ZeliSize, D*, int, ZeliSize, ZeliPoint_32f);
template <typename S, typename D>
using IntersectFn = ZelStatus(ZELCV_CALL*)(const S*, int, ZeliSize, D*, int, ZeliSize, ZeliPoint_32f, ZeliRect*);

float roundTo(float v, float) { return v; }
uint8_t roundTo(float v, uint8_t) { return uint8_t(std::nearbyint(v)); }

// The window by the documented formula: clamped taps, four weights, one
// order of additions.
template <typename S, typename D>
D expectedPixel(const TestImage<S>& src, ZeliSize win, ZeliPoint_32f c, int i, int j) {
  const float x0 = c.x - float(win.width - 1) * 0.5f, y0 = c.y - float(win.height - 1) * 0.5f;
  const float fx = std::floor(x0), fy = std::floor(y0), a = x0 - fx, b = y0 - fy;
  auto s = [&](double col, double row) {
    const int cc = int(std::min(std::max(col, 0.0), double(src.width() - 1)));
    const int rr = int(std::min(std::max(row, 0.0), double(src.height() - 1)));
    return float(src.at(cc, rr));
  };
  const double cx = double(fx) + i, cy = double(fy) + j;
  const float v = ((s(cx, cy) * ((1 - a) * (1 - b)) + s(cx + 1, cy) * (a * (1 - b))) + s(cx, cy + 1) * ((1 - a) * b)) +
                  s(cx + 1, cy + 1) * (a * b);
  return roundTo(v, D());
}

// The pixels whose taps of non-zero weight all lie inside.
ZeliRect expectedInside(ZeliSize source, ZeliSize win, ZeliPoint_32f c) {
  const float x0 = c.x - float(win.width - 1) * 0.5f, y0 = c.y - float(win.height - 1) * 0.5f;
  const double fx = std::floor(x0), fy = std::floor(y0);
  const bool ax = x0 > fx, by = y0 > fy;
  int minI = -1, maxI = -1, minJ = -1, maxJ = -1;
  for (int i = 0; i < win.width; ++i)
    if (fx + i >= 0 && fx + i + ax <= source.width - 1) {
      if (minI < 0) minI = i;
      maxI = i;
    }
  for (int j = 0; j < win.height; ++j)
    if (fy + j >= 0 && fy + j + by <= source.height - 1) {
      if (minJ < 0) minJ = j;
      maxJ = j;
    }
  if (minI < 0 || minJ < 0) return {0, 0, 0, 0};
  return {minI, minJ, maxI - minI + 1, maxJ - minJ + 1};
}

template <typename S, typename D>
void checkCopies(uint32_t seed, CopyFn<S, D> copy, IntersectFn<S, D> intersect) {
  std::mt19937 rng(seed);
  for (int trial = 0; trial < 150; ++trial) {
    Layout sl = randomLayout(rng, 40, 30, 1, int(sizeof(S)), int(sizeof(S)));
    TestImage<S> src(sl);
    if constexpr (std::is_floating_point<S>::value)
      src.fillRandom(rng, -300.0f, 300.0f);
    else
      src.fillRandom(rng, 0, int(std::numeric_limits<S>::max()));
    Layout dl = randomLayout(rng, 25, 25, 1, int(sizeof(D)), int(sizeof(D)));
    TestImage<D> dst(dl), dst2(dl);
    const ZeliSize ss = src.size(), win = dst.size();
    std::uniform_real_distribution<float> along(-0.5f * win.width - 3, float(ss.width) + 0.5f * win.width + 3);
    std::uniform_real_distribution<float> down(-0.5f * win.height - 3, float(ss.height) + 0.5f * win.height + 3);
    ZeliPoint_32f c = {along(rng), down(rng)};
    if (trial % 5 == 0) c = {std::floor(c.x) + (win.width % 2 ? 0.0f : 0.5f), std::floor(c.y)};  // whole-pixel taps
    if (trial % 17 == 0) c = {1e9f, -3e8f};
    SCOPED_TRACE(testing::Message() << ss.width << "x" << ss.height << " window " << win.width << "x" << win.height
                                    << " at " << c.x << ", " << c.y);
    ASSERT_EQ(copy(src.data(), src.step(), ss, dst.data(), dst.step(), win, c), zelStatusOk);
    bool same = true;
    for (int j = 0; j < win.height; ++j)
      for (int i = 0; i < win.width; ++i) {
        const D want = expectedPixel<S, D>(src, win, c, i, j);
        same &= std::memcmp(&dst.at(i, j), &want, sizeof(D)) == 0;
      }
    EXPECT_TRUE(same);
    const ZeliRect want = expectedInside(ss, win, c);
    ZeliRect got = {-5, -5, -5, -5};
    const ZelStatus s = intersect(src.data(), src.step(), ss, dst2.data(), dst2.step(), win, c, &got);
    if (want.width == 0) {
      EXPECT_EQ(s, zelStatusOutOfRange);
      EXPECT_EQ(got.width, -5);
      EXPECT_TRUE(dst2.sameAs(TestImage<D>(dl)));
    } else {
      EXPECT_EQ(s, zelStatusOk);
      EXPECT_TRUE(dst2.sameAs(dst));
      EXPECT_EQ(got.x, want.x);
      EXPECT_EQ(got.y, want.y);
      EXPECT_EQ(got.width, want.width);
      EXPECT_EQ(got.height, want.height);
    }
    EXPECT_TRUE(src.sentinelIntact() && dst.sentinelIntact() && dst2.sentinelIntact());
  }
}

TEST(CopySubpix, MembersMatchBilinearDefinition) {
  checkCopies<Zel8u, Zel8u>(2001, zeliCopySubpix_8u_C1R, zeliCopySubpixIntersect_8u_C1R);
  checkCopies<Zel8u, Zel32f>(2002, zeliCopySubpix_8u32f_C1R, zeliCopySubpixIntersect_8u32f_C1R);
  checkCopies<Zel16u, Zel32f>(2003, zeliCopySubpix_16u32f_C1R, zeliCopySubpixIntersect_16u32f_C1R);
  checkCopies<Zel32f, Zel32f>(2004, zeliCopySubpix_32f_C1R, zeliCopySubpixIntersect_32f_C1R);
}

TEST(CopySubpix, ArgumentChecksInOrder) {
  TestImage<Zel32f> src(Layout{10, 8, 1, 0, 0}), dst(Layout{5, 5, 1, 0, 0});
  ZeliRect r = {1, 2, 3, 4};
  const ZeliPoint_32f c = {4.5f, 3.25f};
  EXPECT_EQ(zeliCopySubpixIntersect_32f_C1R(src.data(), 40, {10, 8}, dst.data(), 20, {0, 5}, c, nullptr),
            zelStatusNullPointer);
  EXPECT_EQ(zeliCopySubpix_32f_C1R(nullptr, 40, {10, 8}, dst.data(), 20, {5, 5}, c), zelStatusNullPointer);
  EXPECT_EQ(zeliCopySubpix_32f_C1R(src.data(), 40, {10, 0}, dst.data(), 20, {5, 5}, c), zelStatusBadSize);
  EXPECT_EQ(zeliCopySubpix_32f_C1R(src.data(), 40, {10, 8}, dst.data(), 20, {5, -2}, c), zelStatusBadSize);
  EXPECT_EQ(zeliCopySubpix_32f_C1R(src.data(), 36, {10, 8}, dst.data(), 20, {5, 5}, c), zelStatusBadStep);
  EXPECT_EQ(zeliCopySubpix_32f_C1R(src.data(), 40, {10, 8}, dst.data(), 19, {5, 5}, c), zelStatusBadStep);
  EXPECT_EQ(zeliCopySubpix_32f_C1R(src.data(), 42, {10, 8}, dst.data(), 20, {5, 5}, c), zelStatusMisalignedStep);
  EXPECT_EQ(zeliCopySubpix_16u32f_C1R(reinterpret_cast<const Zel16u*>(src.data()), 21, {10, 8}, dst.data(), 20,
                                      {5, 5}, c),
            zelStatusMisalignedStep);
  EXPECT_EQ(zeliCopySubpix_32f_C1R(src.data(), 40, {10, 8}, dst.data(), 20, {5, 5},
                                   {std::numeric_limits<float>::quiet_NaN(), 1.0f}),
            zelStatusOutOfRange);
  EXPECT_EQ(zeliCopySubpixIntersect_32f_C1R(src.data(), 40, {10, 8}, dst.data(), 20, {5, 5},
                                            {1.0f, std::numeric_limits<float>::infinity()}, &r),
            zelStatusOutOfRange);
  // Odd steps are fine for 8u.
  TestImage<Zel8u> s8(Layout{10, 8, 1, 1, 0});
  EXPECT_EQ(zeliCopySubpixIntersect_8u32f_C1R(s8.data(), 11, {10, 8}, dst.data(), 20, {5, 5}, c, &r), zelStatusOk);
  EXPECT_EQ(r.x, 0);
  EXPECT_EQ(r.width, 5);
}

// 8-connected, both ends included, one step along the longer axis each time
// and never more than half a pixel from the ideal segment.
TEST(SampleLine, SegmentsAreBresenhamLines) {
  std::mt19937 rng(2010);
  TestImage<Zel8u> img(Layout{37, 23, 3, 5, 3});
  img.fillRandom(rng, 0, 255);
  TestImage<Zel32f> f(Layout{37, 23, 1, 4, 4});
  f.fillRandom(rng, -1.0f, 1.0f);
  TestImage<Zel8u> g(Layout{37, 23, 1, 0, 1});
  g.fillRandom(rng, 0, 255);
  for (int trial = 0; trial < 400; ++trial) {
    const ZeliPoint p1 = {int(rng() % 37), int(rng() % 23)}, p2 = {int(rng() % 37), int(rng() % 23)};
    const int dx = p2.x - p1.x, dy = p2.y - p1.y;
    const int n = std::max(std::abs(dx), std::abs(dy)) + 1;
    std::vector<Zel8u> out(size_t(n) * 3 + 3, 0xEE), grey(size_t(n) + 1, 0xEE);
    std::vector<Zel32f> outf(static_cast<size_t>(n));
    ASSERT_EQ(zeliSampleLine_8u_C3R(img.data(), img.step(), img.size(), p1, p2, out.data()), zelStatusOk);
    ASSERT_EQ(zeliSampleLine_8u_C1R(g.data(), g.step(), g.size(), p1, p2, grey.data()), zelStatusOk);
    ASSERT_EQ(zeliSampleLine_32f_C1R(f.data(), f.step(), f.size(), p1, p2, outf.data()), zelStatusOk);
    EXPECT_EQ(out[size_t(n) * 3], 0xEE);
    EXPECT_EQ(grey[size_t(n)], 0xEE);
    // Find each sample's pixel: the candidates on the step's row or column.
    const bool xMajor = std::abs(dx) >= std::abs(dy);
    for (int k = 0; k < n; ++k) {
      const double t = n == 1 ? 0.0 : double(k) / (n - 1);
      const double ix = p1.x + t * dx, iy = p1.y + t * dy;
      bool found = false;
      for (int off = -1; off <= 1 && !found; ++off) {
        const int x = xMajor ? int(std::lround(ix)) : int(std::lround(ix)) + off;
        const int y = xMajor ? int(std::lround(iy)) + off : int(std::lround(iy));
        if (x < 0 || y < 0 || x >= 37 || y >= 23) continue;
        if ((xMajor ? std::fabs(y - iy) : std::fabs(x - ix)) > 0.5 + 1e-9) continue;
        found = img.at(x, y, 0) == out[3 * k] && img.at(x, y, 1) == out[3 * k + 1] && img.at(x, y, 2) == out[3 * k + 2] &&
                f.at(x, y) == outf[k] && g.at(x, y) == grey[k];
      }
      EXPECT_TRUE(found) << "step " << k << " of " << p1.x << "," << p1.y << " -> " << p2.x << "," << p2.y;
    }
    EXPECT_EQ(out[0], img.at(p1.x, p1.y, 0));
    EXPECT_EQ(grey[n - 1], g.at(p2.x, p2.y));
  }
  Zel8u out[64];
  EXPECT_EQ(zeliSampleLine_8u_C1R(g.data(), g.step(), g.size(), {0, 0}, {37, 0}, out), zelStatusOutOfRange);
  EXPECT_EQ(zeliSampleLine_8u_C1R(g.data(), g.step(), g.size(), {-1, 0}, {3, 0}, out), zelStatusOutOfRange);
  EXPECT_EQ(zeliSampleLine_8u_C1R(g.data(), 36, g.size(), {-1, 0}, {3, 0}, out), zelStatusBadStep);
  EXPECT_EQ(zeliSampleLine_8u_C1R(g.data(), g.step(), g.size(), {0, 0}, {3, 0}, nullptr), zelStatusNullPointer);
}

template <typename T>
void checkGrey(std::mt19937& rng) {
  for (int trial = 0; trial < 30; ++trial) {
    TestImage<T> src(randomLayout(rng, 50, 9, 3, int(sizeof(T)), int(sizeof(T))));
    Layout dl = randomLayout(rng, 1, 1, 1, int(sizeof(T)), int(sizeof(T)));
    dl.width = src.width();
    dl.height = src.height();
    TestImage<T> dst(dl);
    if constexpr (std::is_floating_point<T>::value)
      src.fillRandom(rng, -100.0f, 100.0f);
    else
      src.fillRandom(rng, 0, int(std::numeric_limits<T>::max()));
    std::uniform_real_distribution<float> coef(-0.5f, 1.2f);
    const Zel32f c[3] = {coef(rng), coef(rng), coef(rng)};
    ZelStatus s;
    if constexpr (std::is_same<T, Zel8u>::value)
      s = zeliGradientColorToGray_8u_C3C1R(src.data(), src.step(), dst.data(), dst.step(), src.size(), c);
    else if constexpr (std::is_same<T, Zel16u>::value)
      s = zeliGradientColorToGray_16u_C3C1R(src.data(), src.step(), dst.data(), dst.step(), src.size(), c);
    else
      s = zeliGradientColorToGray_32f_C3C1R(src.data(), src.step(), dst.data(), dst.step(), src.size(), c);
    ASSERT_EQ(s, zelStatusOk);
    for (int y = 0; y < src.height(); ++y)
      for (int x = 0; x < src.width(); ++x) {
        const float v = (c[0] * float(src.at(x, y, 0)) + c[1] * float(src.at(x, y, 1))) + c[2] * float(src.at(x, y, 2));
        T want;
        if constexpr (std::is_floating_point<T>::value)
          want = v;
        else
          want = T(std::min(std::max(std::nearbyint(v), 0.0f), float(std::numeric_limits<T>::max())));
        ASSERT_EQ(std::memcmp(&dst.at(x, y), &want, sizeof(T)), 0) << x << "," << y;
      }
    EXPECT_TRUE(dst.sentinelIntact());
  }
}

TEST(GradientColorToGray, WeightedSumsRoundedAndSaturated) {
  std::mt19937 rng(2020);
  checkGrey<Zel8u>(rng);
  checkGrey<Zel16u>(rng);
  checkGrey<Zel32f>(rng);
}

TEST(FastArctan, VectorAndScalarAgreeWithinTheBound) {
  std::mt19937 rng(2030);
  std::uniform_real_distribution<float> v(-20.0f, 20.0f);
  for (int n = 1; n < 40; ++n) {
    std::vector<float> y(static_cast<size_t>(n)), x(static_cast<size_t>(n)), out(static_cast<size_t>(n) + 1, -1.0f), one(1);
    for (int i = 0; i < n; ++i) {
      y[i] = rng() % 7 == 0 ? 0.0f : v(rng);
      x[i] = rng() % 5 == 0 ? y[i] * (rng() % 2 ? 1.0f : -1.0f) : v(rng);
    }
    ASSERT_EQ(zelibFastArctan_32f(y.data(), x.data(), out.data(), n), zelStatusOk);
    EXPECT_EQ(out[size_t(n)], -1.0f);
    for (int i = 0; i < n; ++i) {
      // One element at a time takes the scalar path: the same bits.
      ASSERT_EQ(zelibFastArctan_32f(&y[i], &x[i], one.data(), 1), zelStatusOk);
      EXPECT_EQ(std::memcmp(&one[0], &out[i], 4), 0);
      if (x[i] == 0 && y[i] == 0) {  // (0, 0) gives 0 whatever the signs
        EXPECT_EQ(out[i], 0.0f);
        continue;
      }
      double exact = std::atan2(double(y[i]), double(x[i])) * (180.0 / 3.14159265358979323846);
      if (exact < 0) exact += 360.0;
      double err = std::fabs(out[i] - exact);
      err = std::min(err, 360.0 - err);
      EXPECT_LE(err, 0.01) << y[i] << ", " << x[i];
      EXPECT_GE(out[i], 0.0f);
      EXPECT_LE(out[i], 360.0f);
    }
  }
  float z = 0, r = -1;
  ASSERT_EQ(zelibFastArctan_32f(&z, &z, &r, 1), zelStatusOk);
  EXPECT_EQ(r, 0.0f);
  EXPECT_EQ(zelibFastArctan_32f(&z, &z, &r, 0), zelStatusBadSize);
  EXPECT_EQ(zelibFastArctan_32f(&z, nullptr, &r, 0), zelStatusNullPointer);
}

template <typename S>
void checkHistory(std::mt19937& rng) {
  for (int trial = 0; trial < 30; ++trial) {
    TestImage<S> sil(randomLayout(rng, 60, 7, 1, int(sizeof(S)), int(sizeof(S))));
    Layout ml = randomLayout(rng, 1, 1, 1, 4, 4);
    ml.width = sil.width();
    ml.height = sil.height();
    TestImage<Zel32f> mhi(ml);
    for (int y = 0; y < sil.height(); ++y)
      for (int x = 0; x < sil.width(); ++x) {
        sil.at(x, y) = rng() % 3 == 0 ? S(1 + rng() % 100) : S(0);
        mhi.at(x, y) = float(rng() % 20);
      }
    TestImage<Zel32f> before(ml);
    for (int y = 0; y < sil.height(); ++y)
      for (int x = 0; x < sil.width(); ++x) before.at(x, y) = mhi.at(x, y);
    const float ts = 21.5f, dur = float(rng() % 15);
    ZelStatus s;
    if constexpr (std::is_same<S, Zel8u>::value)
      s = zeliUpdateMotionHistory_8u32f_C1IR(sil.data(), sil.step(), mhi.data(), mhi.step(), sil.size(), ts, dur);
    else if constexpr (std::is_same<S, Zel16u>::value)
      s = zeliUpdateMotionHistory_16u32f_C1IR(sil.data(), sil.step(), mhi.data(), mhi.step(), sil.size(), ts, dur);
    else
      s = zeliUpdateMotionHistory_32f_C1IR(sil.data(), sil.step(), mhi.data(), mhi.step(), sil.size(), ts, dur);
    ASSERT_EQ(s, zelStatusOk);
    for (int y = 0; y < sil.height(); ++y)
      for (int x = 0; x < sil.width(); ++x) {
        const float old = before.at(x, y);
        const float want = sil.at(x, y) != S(0) ? ts : (old < ts - dur ? 0.0f : old);
        ASSERT_EQ(mhi.at(x, y), want) << x << "," << y;
      }
    EXPECT_TRUE(mhi.sentinelIntact());
  }
}

TEST(UpdateMotionHistory, SilhouetteStampsAndOldEntriesClear) {
  std::mt19937 rng(2040);
  checkHistory<Zel8u>(rng);
  checkHistory<Zel16u>(rng);
  checkHistory<Zel32f>(rng);
  TestImage<Zel32f> mhi(Layout{4, 2, 1, 0, 0});
  TestImage<Zel16u> sil(Layout{4, 2, 1, 0, 0});
  EXPECT_EQ(zeliUpdateMotionHistory_16u32f_C1IR(sil.data(), 9, mhi.data(), 16, {4, 2}, 1.0f, 1.0f),
            zelStatusMisalignedStep);
  EXPECT_EQ(zeliUpdateMotionHistory_16u32f_C1IR(sil.data(), 8, mhi.data(), 12, {4, 2}, 1.0f, 1.0f), zelStatusBadStep);
}

}  // namespace
