// Rectangle standard deviations, upright and tilted, against direct sums over
// the rectangles' pixels; a constant area; the checks and their order.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <functional>
#include <random>

#include "abi/integral_reference.h"
#include "zelcv.h"

namespace {

using zeltest::exactLayout;
using zeltest::fillGarbage;
using zeltest::PixelSums;
using zeltest::sameBits;
using zeltest::TestImage;

int32_t wrap(int64_t v) { return int32_t(uint32_t(uint64_t(v))); }

// The integrals of one image in every element type the members take. The 32s
// planes start from large values so that they wrap; differences must not care.
struct Integrals {
  Integrals(std::mt19937& rng, const PixelSums& sums, int cols, int rows, bool tilted)
      : f(exactLayout(rng, cols, rows, 4, rng() % 2)),
        i(exactLayout(rng, cols, rows, 4, rng() % 2)),
        q(exactLayout(rng, cols, rows, 8, rng() % 2)),
        qi(exactLayout(rng, cols, rows, 4, rng() % 2)) {
    const int64_t ival = int32_t(rng()), qval = int32_t(rng());
    for (int y = 0; y < rows; ++y)
      for (int x = 0; x < cols; ++x) {
        int64_t s = tilted ? sums.tilted(y, x) : sums.plain(y, x);
        int64_t s2 = tilted ? sums.tilted(y, x, true) : sums.plain(y, x, true);
        f.at(x, y) = float(s + 100);
        i.at(x, y) = wrap(ival + s);
        q.at(x, y) = double(s2) + 1e6;
        qi.at(x, y) = wrap(qval + s2);
      }
  }
  bool intact() const { return f.sentinelIntact() && i.sentinelIntact() && q.sentinelIntact() && qi.sentinelIntact(); }
  TestImage<Zel32f> f;
  TestImage<Zel32s> i;
  TestImage<Zel64f> q;
  TestImage<Zel32s> qi;
};

// The documented arithmetic, from exact sums S and Q of n pixels.
float expected32f(double S, double Q, int64_t n) {
  double inv = 1.0 / double(float(n));
  double mean = double(float(S)) * inv;
  float v = float(Q * inv - mean * mean);
  return std::sqrt(v < 0 ? 0.0f : v);
}
int32_t expected32s(double S, double Q, int64_t n, int scaleFactor) {
  double v = (double(n) * Q - S * S) / (double(n) * double(n));
  double d = std::sqrt(v < 0 ? 0.0 : v) * std::ldexp(1.0, -scaleFactor);
  return int32_t(std::nearbyint(d < 2147483647.0 ? d : 2147483647.0));
}

struct Rects {
  ZeliRect rect;
  ZeliSize roi;
};

// A random rectangle and the largest-or-smaller ROI that keeps every
// rectangle inside integrals of cols x rows.
Rects randomRect(std::mt19937& rng, int cols, int rows, bool tilted) {
  auto pick = [&](int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); };
  for (;;) {
    ZeliRect r;
    r.width = pick(1, 8);
    r.height = pick(1, 8);
    r.x = (tilted ? r.height : 0) + pick(0, 3);
    r.y = pick(0, 3);
    int maxW = cols - r.x - r.width;
    int maxH = rows - r.y - r.height - (tilted ? r.width : 0);
    if (maxW < 1 || maxH < 1) continue;
    return {r, {pick(1, maxW), pick(1, maxH)}};
  }
}

TEST(RectStdDev, UprightAndTiltedMatchDirectSums) {
  std::mt19937 rng(501);
  for (int iter = 0; iter < 40; ++iter) {
    const bool tilted = iter % 2 == 1;
    const int w = std::uniform_int_distribution<int>(8, 50)(rng);
    const int h = std::uniform_int_distribution<int>(12, 50)(rng);
    TestImage<uint8_t> src(exactLayout(rng, w, h, 1, true));
    src.fillRandom(rng, 0, iter % 3 == 0 ? 3 : 255);  // some nearly flat images
    PixelSums sums(src, w, h);
    const int cols = w + (tilted ? 2 : 1), rows = h + (tilted ? 2 : 1);
    Integrals in(rng, sums, cols, rows, tilted);
    Rects rr = randomRect(rng, cols, rows, tilted);
    const ZeliRect r = rr.rect;
    const ZeliSize roi = rr.roi;
    SCOPED_TRACE(testing::Message() << (tilted ? "tilted " : "upright ") << r.x << "," << r.y << " "
                                    << r.width << "x" << r.height << " roi " << roi.width << "x"
                                    << roi.height);
    const int64_t n = int64_t(r.width) * r.height * (tilted ? 2 : 1);
    auto sumsAt = [&](int x, int y, bool squares) {
      return double(tilted ? sums.tiltedRect(x + r.x, y + r.y, r.width, r.height, squares)
                           : sums.rect(x + r.x, y + r.y, r.width, r.height, squares));
    };
    std::vector<double> S(size_t(roi.width) * roi.height), Q(S.size());
    for (int y = 0; y < roi.height; ++y)
      for (int x = 0; x < roi.width; ++x) {
        S[y * roi.width + x] = sumsAt(x, y, false);
        Q[y * roi.width + x] = sumsAt(x, y, true);
      }
    const int sf = std::uniform_int_distribution<int>(-3, 4)(rng);

    TestImage<Zel32f> df(exactLayout(rng, roi.width, roi.height, 4, iter % 4 == 0));
    TestImage<Zel32s> di(exactLayout(rng, roi.width, roi.height, 4, iter % 4 == 1));
    auto want32f = [&](int x, int y) { return expected32f(S[y * roi.width + x], Q[y * roi.width + x], n); };
    auto want32s = [&](int x, int y) { return expected32s(S[y * roi.width + x], Q[y * roi.width + x], n, sf); };

    auto run32f = tilted ? zeliTiltedRectStdDev_32f_C1R : zeliRectStdDev_32f_C1R;
    auto run32s32f = tilted ? zeliTiltedRectStdDev_32s32f_C1R : zeliRectStdDev_32s32f_C1R;
    auto run32s = tilted ? zeliTiltedRectStdDev_32s_C1RSfs : zeliRectStdDev_32s_C1RSfs;
    fillGarbage(df, rng);
    ASSERT_EQ(run32f(in.f.data(), in.f.step(), in.q.data(), in.q.step(), df.data(), df.step(), roi, r), 0);
    EXPECT_TRUE(sameBits(df, want32f));
    fillGarbage(df, rng);
    ASSERT_EQ(run32s32f(in.i.data(), in.i.step(), in.q.data(), in.q.step(), df.data(), df.step(), roi, r), 0);
    EXPECT_TRUE(sameBits(df, want32f));
    fillGarbage(di, rng);
    ASSERT_EQ(run32s(in.i.data(), in.i.step(), in.qi.data(), in.qi.step(), di.data(), di.step(), roi, r, sf), 0);
    EXPECT_TRUE(sameBits(di, want32s));
    EXPECT_TRUE(in.intact());
    EXPECT_TRUE(df.sentinelIntact());
    EXPECT_TRUE(di.sentinelIntact());
  }
}

// A constant area: the floating members give 0 wherever rounding of 1/n
// pushes the variance below zero (and the documented tiny value where it
// lands just above); the scaled member gives exactly 0 always. A large
// negative scale factor saturates a non-zero deviation.
TEST(RectStdDev, ConstantAreaGivesZeroAndScaledResultSaturates) {
  std::mt19937 rng(502);
  const int w = 40, h = 40;
  int negative = 0;
  for (int value : {1, 37, 173, 255}) {
    TestImage<uint8_t> src(exactLayout(rng, w, h, 1, true));
    src.fillRandom(rng, value, value);
    PixelSums sums(src, w, h);
    for (bool tilted : {false, true}) {
      const int cols = w + (tilted ? 2 : 1), rows = h + (tilted ? 2 : 1);
      Integrals in(rng, sums, cols, rows, tilted);
      for (int k = 0; k < 12; ++k) {
        // Keep tilted rectangles off column w, which the integral leaves empty.
        Rects rr = randomRect(rng, w + 1, rows, tilted);
        SCOPED_TRACE(testing::Message() << value << (tilted ? " tilted " : " upright ") << rr.rect.width
                                        << "x" << rr.rect.height);
        TestImage<Zel32f> df(exactLayout(rng, rr.roi.width, rr.roi.height, 4, false));
        TestImage<Zel32s> di(exactLayout(rng, rr.roi.width, rr.roi.height, 4, false));
        auto run32f = tilted ? zeliTiltedRectStdDev_32f_C1R : zeliRectStdDev_32f_C1R;
        auto run32s32f = tilted ? zeliTiltedRectStdDev_32s32f_C1R : zeliRectStdDev_32s32f_C1R;
        auto run32s = tilted ? zeliTiltedRectStdDev_32s_C1RSfs : zeliRectStdDev_32s_C1RSfs;
        const int64_t n = int64_t(rr.rect.width) * rr.rect.height * (tilted ? 2 : 1);
        const double inv = 1.0 / double(float(n)), mean = double(value) * double(n) * inv;
        if (double(value) * value * double(n) * inv - mean * mean < 0) ++negative;
        const float want = expected32f(double(value) * n, double(value) * value * n, n);
        auto constant32f = [&](int, int) { return want; };
        ASSERT_EQ(run32f(in.f.data(), in.f.step(), in.q.data(), in.q.step(), df.data(), df.step(), rr.roi, rr.rect), 0);
        EXPECT_TRUE(sameBits(df, constant32f));
        fillGarbage(df, rng);
        ASSERT_EQ(run32s32f(in.i.data(), in.i.step(), in.q.data(), in.q.step(), df.data(), df.step(), rr.roi, rr.rect), 0);
        EXPECT_TRUE(sameBits(df, constant32f));
        ASSERT_EQ(run32s(in.i.data(), in.i.step(), in.qi.data(), in.qi.step(), di.data(), di.step(), rr.roi, rr.rect, -40), 0);
        EXPECT_TRUE(sameBits(di, [](int, int) { return 0; }));
        EXPECT_TRUE(df.sentinelIntact() && di.sentinelIntact() && in.intact());
      }
    }
  }
  EXPECT_GT(negative, 0);  // the clamp was exercised
  // A two-valued image: deviation 0.5 times 2^40 saturates.
  TestImage<uint8_t> src(exactLayout(rng, 4, 4, 1, true));
  for (int y = 0; y < 4; ++y)
    for (int x = 0; x < 4; ++x) src.at(x, y) = uint8_t(x % 2);
  PixelSums sums(src, 4, 4);
  Integrals in(rng, sums, 5, 5, false);
  TestImage<Zel32s> di(exactLayout(rng, 1, 1, 4, true));
  ASSERT_EQ(zeliRectStdDev_32s_C1RSfs(in.i.data(), in.i.step(), in.qi.data(), in.qi.step(), di.data(),
                                      di.step(), {1, 1}, {0, 0, 4, 4}, -40),
            0);
  EXPECT_EQ(di.at(0, 0), 2147483647);
  ASSERT_EQ(zeliRectStdDev_32s_C1RSfs(in.i.data(), in.i.step(), in.qi.data(), in.qi.step(), di.data(),
                                      di.step(), {1, 1}, {0, 0, 4, 4}, -2),
            0);
  EXPECT_EQ(di.at(0, 0), 2);
  ASSERT_EQ(zeliRectStdDev_32s_C1RSfs(in.i.data(), in.i.step(), in.qi.data(), in.qi.step(), di.data(),
                                      di.step(), {1, 1}, {0, 0, 4, 4}, 2),
            0);
  EXPECT_EQ(di.at(0, 0), 0);  // 0.125 rounds to 0
}

// ---- Argument checks ----------------------------------------------------------

struct Member {
  const char* name;
  int sqrBytes;
  bool tilted;
  std::function<ZelStatus(const void*, int, const void*, int, void*, int, ZeliSize, ZeliRect)> call;
};

std::vector<Member> members() {
  using F = const Zel32f*;
  using I = const Zel32s*;
  using D = const Zel64f*;
  return {
      {"RectStdDev_32f", 8, false,
       [](const void* s, int ss, const void* q, int qs, void* d, int ds, ZeliSize r, ZeliRect rc) {
         return zeliRectStdDev_32f_C1R(F(s), ss, D(q), qs, static_cast<Zel32f*>(d), ds, r, rc);
       }},
      {"RectStdDev_32s32f", 8, false,
       [](const void* s, int ss, const void* q, int qs, void* d, int ds, ZeliSize r, ZeliRect rc) {
         return zeliRectStdDev_32s32f_C1R(I(s), ss, D(q), qs, static_cast<Zel32f*>(d), ds, r, rc);
       }},
      {"RectStdDev_32s_Sfs", 4, false,
       [](const void* s, int ss, const void* q, int qs, void* d, int ds, ZeliSize r, ZeliRect rc) {
         return zeliRectStdDev_32s_C1RSfs(I(s), ss, I(q), qs, static_cast<Zel32s*>(d), ds, r, rc, 0);
       }},
      {"TiltedRectStdDev_32f", 8, true,
       [](const void* s, int ss, const void* q, int qs, void* d, int ds, ZeliSize r, ZeliRect rc) {
         return zeliTiltedRectStdDev_32f_C1R(F(s), ss, D(q), qs, static_cast<Zel32f*>(d), ds, r, rc);
       }},
      {"TiltedRectStdDev_32s32f", 8, true,
       [](const void* s, int ss, const void* q, int qs, void* d, int ds, ZeliSize r, ZeliRect rc) {
         return zeliTiltedRectStdDev_32s32f_C1R(I(s), ss, D(q), qs, static_cast<Zel32f*>(d), ds, r, rc);
       }},
      {"TiltedRectStdDev_32s_Sfs", 4, true,
       [](const void* s, int ss, const void* q, int qs, void* d, int ds, ZeliSize r, ZeliRect rc) {
         return zeliTiltedRectStdDev_32s_C1RSfs(I(s), ss, I(q), qs, static_cast<Zel32s*>(d), ds, r, rc, 3);
       }},
  };
}

TEST(RectStdDevChecks, CodesInTheFixedOrderRectangleLast) {
  alignas(16) static uint8_t srcBuf[8192], sqrBuf[8192], dstBuf[4096];
  const int w = 3, h = 2;
  for (const Member& m : members()) {
    SCOPED_TRACE(m.name);
    const ZeliRect rect = {m.tilted ? 2 : 1, 1, 2, 2};
    const int cols = w + rect.x + rect.width;
    const int ss = 4 * cols, qs = m.sqrBytes * cols, ds = 4 * w;
    struct Case {
      const void* src;
      int srcStep;
      const void* sqr;
      int sqrStep;
      void* dst;
      int dstStep;
      ZeliSize roi;
      ZeliRect rect;
      ZelStatus want;
    };
    const ZeliRect noWidth = {rect.x, rect.y, 0, rect.height};
    const std::vector<Case> cases = {
        {nullptr, ss, sqrBuf, qs, dstBuf, ds, {0, h}, rect, zelStatusNullPointer},
        {srcBuf, ss, nullptr, qs, dstBuf, ds, {w, h}, noWidth, zelStatusNullPointer},
        {srcBuf, ss, sqrBuf, qs, nullptr, ds, {w, h}, rect, zelStatusNullPointer},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds, {0, h}, rect, zelStatusBadSize},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds, {w, -2}, noWidth, zelStatusBadSize},
        {srcBuf, 4 * (w + rect.x) - 4, sqrBuf, qs + 2, dstBuf, ds, {w, h}, noWidth, zelStatusBadStep},
        {srcBuf, ss, sqrBuf, qs - m.sqrBytes, dstBuf, ds, {w, h}, rect, zelStatusBadStep},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds - 4, {w, h}, rect, zelStatusBadStep},
        {srcBuf, ss + 2, sqrBuf, qs, dstBuf, ds, {w, h}, noWidth, zelStatusMisalignedStep},
        {srcBuf, ss, sqrBuf, qs + m.sqrBytes / 2, dstBuf, ds, {w, h}, rect, zelStatusMisalignedStep},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds + 2, {w, h}, rect, zelStatusMisalignedStep},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds, {w, h}, noWidth, zelStatusBadSize},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds, {w, h}, {rect.x, rect.y, rect.width, 0}, zelStatusBadSize},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds, {w, h}, {-1, rect.y, rect.width, rect.height}, zelStatusBadSize},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds, {w, h}, {rect.x, -1, rect.width, rect.height}, zelStatusBadSize},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds, {w, h}, {rect.x, rect.y, rect.width, rect.x + 1},
         m.tilted ? zelStatusBadSize : zelStatusOk},
        {srcBuf, ss, sqrBuf, qs, dstBuf, ds, {w, h}, rect, zelStatusOk},
    };
    for (size_t i = 0; i < cases.size(); ++i) {
      const Case& c = cases[i];
      std::memset(dstBuf, 0x5A, sizeof dstBuf);
      EXPECT_EQ(m.call(c.src, c.srcStep, c.sqr, c.sqrStep, c.dst, c.dstStep, c.roi, c.rect), c.want)
          << "case " << i;
      if (c.want != zelStatusOk) {
        bool untouched = true;
        for (uint8_t b : dstBuf) untouched &= b == 0x5A;
        EXPECT_TRUE(untouched) << "case " << i;
      }
    }
  }
}

}  // namespace
