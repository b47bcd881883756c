// Plain, squared and tilted integral images against sums taken straight from
// their definitions, over random sizes, steps and start addresses; the
// argument checks with their codes and order.
#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <limits>
#include <random>

#include "abi/integral_reference.h"
#include "zelcv.h"

namespace {

using zeltest::exactLayout;
using zeltest::fillGarbage;
using zeltest::PixelSums;
using zeltest::sameBits;
using zeltest::TestImage;

struct Dims {
  int w, h;
  bool minimal;
};

// 1x1 and 100x100 always, then a random sample in between.
std::vector<Dims> sampleDims(std::mt19937& rng, int count) {
  std::vector<Dims> dims = {{1, 1, true}, {100, 100, false}, {1, 37, false}, {53, 1, true}};
  std::uniform_int_distribution<int> side(1, 100);
  while (int(dims.size()) < count) dims.push_back({side(rng), side(rng), rng() % 3 == 0});
  return dims;
}

// Start values that keep every float result exact: quarters, small.
float quarterValue(std::mt19937& rng) {
  return float(std::uniform_int_distribution<int>(-4000, 4000)(rng)) / 4.0f;
}

int32_t wrap(int64_t v) { return int32_t(uint32_t(uint64_t(v))); }

TestImage<uint8_t> randomSource(std::mt19937& rng, int w, int h, bool minimal, int lo = 0,
                                int hi = 255) {
  TestImage<uint8_t> src(exactLayout(rng, w, h, 1, minimal));
  src.fillRandom(rng, lo, hi);
  return src;
}

TEST(Integral, PlainAndSquaredMatchDirectSums) {
  std::mt19937 rng(401);
  for (const Dims& d : sampleDims(rng, 24)) {
    SCOPED_TRACE(testing::Message() << d.w << " x " << d.h);
    const int w = d.w, h = d.h;
    const ZeliSize roi = {w, h};
    TestImage<uint8_t> src = randomSource(rng, w, h, d.minimal);
    PixelSums sums(src, w, h);
    auto out = [&](int bytes) { return exactLayout(rng, w + 1, h + 1, bytes, d.minimal); };
    const int32_t ival = int32_t(rng()), isq = int32_t(rng());
    const float fval = quarterValue(rng);
    const double dsq = double(quarterValue(rng)) * 1000.0;
    auto sum32s = [&](int x, int y) { return wrap(ival + sums.plain(y, x)); };
    auto sum32f = [&](int x, int y) { return float(double(fval) + double(sums.plain(y, x))); };
    auto sq32s = [&](int x, int y) { return wrap(isq + sums.plain(y, x, true)); };
    auto sq64f = [&](int x, int y) { return dsq + double(sums.plain(y, x, true)); };

    TestImage<Zel32s> a(out(4)), b(out(4));
    TestImage<Zel32f> f(out(4));
    TestImage<Zel64f> q(out(8));
    fillGarbage(a, rng);
    ASSERT_EQ(zeliIntegral_8u32s_C1R(src.data(), src.step(), a.data(), a.step(), roi, ival), 0);
    EXPECT_TRUE(sameBits(a, sum32s));
    fillGarbage(f, rng);
    ASSERT_EQ(zeliIntegral_8u32f_C1R(src.data(), src.step(), f.data(), f.step(), roi, fval), 0);
    EXPECT_TRUE(sameBits(f, sum32f));

    fillGarbage(a, rng);
    fillGarbage(b, rng);
    ASSERT_EQ(zeliSqrIntegral_8u32s_C1R(src.data(), src.step(), a.data(), a.step(), b.data(),
                                        b.step(), roi, ival, isq),
              0);
    EXPECT_TRUE(sameBits(a, sum32s));
    EXPECT_TRUE(sameBits(b, sq32s));
    fillGarbage(a, rng);
    fillGarbage(q, rng);
    ASSERT_EQ(zeliSqrIntegral_8u32s64f_C1R(src.data(), src.step(), a.data(), a.step(), q.data(),
                                           q.step(), roi, ival, dsq),
              0);
    EXPECT_TRUE(sameBits(a, sum32s));
    EXPECT_TRUE(sameBits(q, sq64f));
    fillGarbage(f, rng);
    fillGarbage(q, rng);
    ASSERT_EQ(zeliSqrIntegral_8u32f64f_C1R(src.data(), src.step(), f.data(), f.step(), q.data(),
                                           q.step(), roi, fval, dsq),
              0);
    EXPECT_TRUE(sameBits(f, sum32f));
    EXPECT_TRUE(sameBits(q, sq64f));
    for (bool intact : {src.sentinelIntact(), a.sentinelIntact(), b.sentinelIntact(),
                        f.sentinelIntact(), q.sentinelIntact()})
      EXPECT_TRUE(intact);
  }
}

// Sums-only members over rows far wider than the vector blocks and the
// staging distance of the wide kernels, with ragged tails; bright rows keep
// every lane near its largest running sum.
TEST(Integral, WideRowsMatchDirectSums) {
  std::mt19937 rng(406);
  for (int w : {31, 32, 33, 63, 69, 255, 256, 257, 288, 511, 512, 545, 1055, 2100, 4099}) {
    for (bool bright : {false, true}) {
      SCOPED_TRACE(testing::Message() << "width " << w << (bright ? ", bright" : ""));
      const int h = std::uniform_int_distribution<int>(1, 4)(rng);
      TestImage<uint8_t> src = randomSource(rng, w, h, w % 2 == 0, bright ? 240 : 0, 255);
      PixelSums sums(src, w, h);
      const int32_t ival = int32_t(rng());
      const float fval = quarterValue(rng);
      TestImage<Zel32s> a(exactLayout(rng, w + 1, h + 1, 4, w % 3 == 0));
      TestImage<Zel32f> f(exactLayout(rng, w + 1, h + 1, 4, w % 3 == 1));
      fillGarbage(a, rng);
      fillGarbage(f, rng);
      ASSERT_EQ(zeliIntegral_8u32s_C1R(src.data(), src.step(), a.data(), a.step(), {w, h}, ival), 0);
      EXPECT_TRUE(sameBits(a, [&](int x, int y) { return wrap(ival + sums.plain(y, x)); }));
      ASSERT_EQ(zeliIntegral_8u32f_C1R(src.data(), src.step(), f.data(), f.step(), {w, h}, fval), 0);
      EXPECT_TRUE(sameBits(f, [&](int x, int y) { return float(double(fval) + double(sums.plain(y, x))); }));
      EXPECT_TRUE(src.sentinelIntact());
      EXPECT_TRUE(a.sentinelIntact());
      EXPECT_TRUE(f.sentinelIntact());
    }
  }
}

// Eighths in [-64, 64]: every partial sum of a 100 x 100 image stays exact in
// single precision, so the sequential float sum has one right answer.
TEST(Integral, FloatSourceMatchesDirectSums) {
  std::mt19937 rng(402);
  for (const Dims& d : sampleDims(rng, 16)) {
    SCOPED_TRACE(testing::Message() << d.w << " x " << d.h);
    TestImage<Zel32f> src(exactLayout(rng, d.w, d.h, 4, d.minimal));
    std::uniform_int_distribution<int> eighths(-512, 512);
    for (int y = 0; y < d.h; ++y)
      for (int x = 0; x < d.w; ++x) src.at(x, y) = float(eighths(rng)) / 8.0f;
    TestImage<Zel32f> dst(exactLayout(rng, d.w + 1, d.h + 1, 4, d.minimal));
    fillGarbage(dst, rng);
    ASSERT_EQ(zeliIntegral_32f_C1R(src.data(), src.step(), dst.data(), dst.step(), {d.w, d.h}), 0);
    EXPECT_TRUE(sameBits(dst, [&](int x, int y) {
      double s = 0;
      for (int r = 0; r < y; ++r)
        for (int c = 0; c < x; ++c) s += src.at(c, r);
      return float(s);
    }));
    EXPECT_TRUE(src.sentinelIntact());
    EXPECT_TRUE(dst.sentinelIntact());
  }
}

TEST(TiltedIntegral, MembersMatchConeSums) {
  std::mt19937 rng(403);
  for (const Dims& d : sampleDims(rng, 24)) {
    SCOPED_TRACE(testing::Message() << d.w << " x " << d.h);
    const int w = d.w, h = d.h;
    const ZeliSize roi = {w, h};
    // One extra source column: the squared members read it, the others must
    // not count it.
    TestImage<uint8_t> src = randomSource(rng, w + 1, h, d.minimal);
    PixelSums clear(src, w, h);
    PixelSums withRight(src, w, h, [&](int r) { return int64_t(src.at(w, r)); });
    auto out = [&](int bytes) { return exactLayout(rng, w + 2, h + 2, bytes, d.minimal); };
    const int32_t ival = int32_t(rng()), isq = int32_t(rng());
    const float fval = quarterValue(rng);
    const double dsq = double(quarterValue(rng)) * 1000.0;

    // 32s: destination write-only, nothing right of the ROI counted.
    TestImage<Zel32s> a(out(4)), b(out(4));
    fillGarbage(a, rng);
    ASSERT_EQ(zeliTiltedIntegral_8u32s_C1R(src.data(), src.step(), a.data(), a.step(), roi, ival), 0);
    EXPECT_TRUE(sameBits(a, [&](int x, int n) { return wrap(ival + clear.tilted(n, x)); }));

    // 32f: the last column adds what the destination held there, which acts
    // as a pixel right of the ROI; first with a cleared destination.
    TestImage<Zel32f> f(out(4));
    ASSERT_EQ(zeliTiltedIntegral_8u32f_C1R(src.data(), src.step(), f.data(), f.step(), roi, fval), 0);
    EXPECT_TRUE(sameBits(f, [&](int x, int n) { return float(fval + double(clear.tilted(n, x))); }));
    std::vector<int64_t> held(h);
    fillGarbage(f, rng);
    for (int r = 0; r < h; ++r) {
      held[r] = std::uniform_int_distribution<int>(0, 300)(rng);
      f.at(w, r + 2) = float(held[r]);
    }
    PixelSums heldRight(src, w, h, [&](int r) { return held[r]; });
    ASSERT_EQ(zeliTiltedIntegral_8u32f_C1R(src.data(), src.step(), f.data(), f.step(), roi, fval), 0);
    EXPECT_TRUE(sameBits(f, [&](int x, int n) { return float(fval + double(heldRight.tilted(n, x))); }));

    // Squared members: both planes count the pixel right of the ROI.
    auto sum32s = [&](int x, int n) { return wrap(ival + withRight.tilted(n, x)); };
    auto sq32s = [&](int x, int n) { return wrap(isq + withRight.tilted(n, x, true)); };
    auto sq64f = [&](int x, int n) { return dsq + double(withRight.tilted(n, x, true)); };
    fillGarbage(a, rng);
    fillGarbage(b, rng);
    ASSERT_EQ(zeliTiltedSqrIntegral_8u32s_C1R(src.data(), src.step(), a.data(), a.step(), b.data(),
                                              b.step(), roi, ival, isq),
              0);
    EXPECT_TRUE(sameBits(a, sum32s));
    EXPECT_TRUE(sameBits(b, sq32s));
    TestImage<Zel64f> q(out(8));
    fillGarbage(a, rng);
    fillGarbage(q, rng);
    ASSERT_EQ(zeliTiltedSqrIntegral_8u32s64f_C1R(src.data(), src.step(), a.data(), a.step(),
                                                 q.data(), q.step(), roi, ival, dsq),
              0);
    EXPECT_TRUE(sameBits(a, sum32s));
    EXPECT_TRUE(sameBits(q, sq64f));
    fillGarbage(f, rng);
    fillGarbage(q, rng);
    ASSERT_EQ(zeliTiltedSqrIntegral_8u32f64f_C1R(src.data(), src.step(), f.data(), f.step(),
                                                 q.data(), q.step(), roi, fval, dsq),
              0);
    EXPECT_TRUE(sameBits(f, [&](int x, int n) { return float(fval + double(withRight.tilted(n, x))); }));
    EXPECT_TRUE(sameBits(q, sq64f));
    for (bool intact : {src.sentinelIntact(), a.sentinelIntact(), b.sentinelIntact(),
                        f.sentinelIntact(), q.sentinelIntact()})
      EXPECT_TRUE(intact);
  }
}

// A large bright image: the squares pass 2^32 several times, the sums start
// just below 2^31 and wrap through the sign; checked on a sample of cells and
// every seventh cell of the last row and column.
TEST(Integral, ThirtyTwoBitSumsWrapOnLargeBrightImage) {
  std::mt19937 rng(404);
  const int w = 700, h = 600;
  TestImage<uint8_t> src = randomSource(rng, w + 1, h, false, 230, 255);
  PixelSums sums(src, w, h);
  PixelSums withRight(src, w, h, [&](int r) { return int64_t(src.at(w, r)); });
  const int32_t val = std::numeric_limits<int32_t>::max() - 5;
  TestImage<Zel32s> a(exactLayout(rng, w + 2, h + 2, 4, false)), b(exactLayout(rng, w + 2, h + 2, 4, true));
  std::vector<std::pair<int, int>> cells;
  for (int i = 0; i < 300; ++i) cells.push_back({int(rng() % (w + 1)), int(rng() % (h + 1))});
  for (int x = 0; x <= w; x += 7) cells.push_back({x, h});
  for (int y = 0; y <= h; y += 7) cells.push_back({w, y});
  ASSERT_GT(sums.plain(h, w, true), int64_t(4) << 32);

  ASSERT_EQ(zeliSqrIntegral_8u32s_C1R(src.data(), src.step(), a.data(), a.step(), b.data(), b.step(),
                                      {w, h}, val, val),
            0);
  for (auto [x, y] : cells) {
    ASSERT_EQ(a.at(x, y), wrap(val + sums.plain(y, x))) << x << ", " << y;
    ASSERT_EQ(b.at(x, y), wrap(val + sums.plain(y, x, true))) << x << ", " << y;
  }
  ASSERT_EQ(zeliTiltedSqrIntegral_8u32s_C1R(src.data(), src.step(), a.data(), a.step(), b.data(),
                                            b.step(), {w, h}, val, val),
            0);
  for (auto [x, y] : cells) {
    ASSERT_EQ(a.at(x, y + 1), wrap(val + withRight.tilted(y + 1, x))) << x << ", " << y;
    ASSERT_EQ(b.at(x, y + 1), wrap(val + withRight.tilted(y + 1, x, true))) << x << ", " << y;
  }
  EXPECT_TRUE(a.sentinelIntact());
  EXPECT_TRUE(b.sentinelIntact());
  EXPECT_TRUE(src.sentinelIntact());
}

// The row sums of squares are unsigned 32-bit: a bright row 34000 pixels wide
// passes 2^31 and must still reach the 64f plane as a positive value.
TEST(Integral, WideRowSquaresStayUnsigned) {
  std::mt19937 rng(405);
  const int w = 34000;
  TestImage<uint8_t> src = randomSource(rng, w, 2, true, 255, 255);
  TestImage<Zel32s> a(exactLayout(rng, w + 1, 3, 4, true));
  TestImage<Zel32f> f(exactLayout(rng, w + 1, 3, 4, true));
  TestImage<Zel64f> q(exactLayout(rng, w + 1, 3, 8, false));
  ASSERT_EQ(zeliSqrIntegral_8u32s64f_C1R(src.data(), src.step(), a.data(), a.step(), q.data(),
                                         q.step(), {w, 2}, 0, 0.5),
            0);
  EXPECT_EQ(q.at(w, 1), 0.5 + 65025.0 * w);
  EXPECT_EQ(q.at(w, 2), 0.5 + 2 * 65025.0 * w);
  ASSERT_EQ(zeliSqrIntegral_8u32f64f_C1R(src.data(), src.step(), f.data(), f.step(), q.data(),
                                         q.step(), {w, 2}, 0.0f, 0.0),
            0);
  EXPECT_EQ(q.at(w, 2), 2 * 65025.0 * w);
  EXPECT_EQ(f.at(w, 2), float(2 * 255.0 * w));
  EXPECT_TRUE(q.sentinelIntact());
  EXPECT_TRUE(f.sentinelIntact());
  EXPECT_TRUE(a.sentinelIntact());
}

// ---- Argument checks ----------------------------------------------------------

// One member seen through a common argument list; `sqrBytes` 0 when it has no
// second output.
struct Member {
  const char* name;
  int srcBytes, dstBytes, sqrBytes, extraCols;
  std::function<ZelStatus(const void*, int, void*, int, void*, int, ZeliSize)> call;
};

std::vector<Member> members() {
  auto s8 = [](const void* p) { return static_cast<const Zel8u*>(p); };
  auto i32 = [](void* p) { return static_cast<Zel32s*>(p); };
  auto f32 = [](void* p) { return static_cast<Zel32f*>(p); };
  auto f64 = [](void* p) { return static_cast<Zel64f*>(p); };
  return {
      {"Integral_8u32s", 1, 4, 0, 1,
       [=](const void* s, int ss, void* d, int ds, void*, int, ZeliSize r) {
         return zeliIntegral_8u32s_C1R(s8(s), ss, i32(d), ds, r, 0);
       }},
      {"Integral_8u32f", 1, 4, 0, 1,
       [=](const void* s, int ss, void* d, int ds, void*, int, ZeliSize r) {
         return zeliIntegral_8u32f_C1R(s8(s), ss, f32(d), ds, r, 0);
       }},
      {"Integral_32f", 4, 4, 0, 1,
       [=](const void* s, int ss, void* d, int ds, void*, int, ZeliSize r) {
         return zeliIntegral_32f_C1R(static_cast<const Zel32f*>(s), ss, f32(d), ds, r);
       }},
      {"SqrIntegral_8u32s", 1, 4, 4, 1,
       [=](const void* s, int ss, void* d, int ds, void* q, int qs, ZeliSize r) {
         return zeliSqrIntegral_8u32s_C1R(s8(s), ss, i32(d), ds, i32(q), qs, r, 0, 0);
       }},
      {"SqrIntegral_8u32s64f", 1, 4, 8, 1,
       [=](const void* s, int ss, void* d, int ds, void* q, int qs, ZeliSize r) {
         return zeliSqrIntegral_8u32s64f_C1R(s8(s), ss, i32(d), ds, f64(q), qs, r, 0, 0);
       }},
      {"SqrIntegral_8u32f64f", 1, 4, 8, 1,
       [=](const void* s, int ss, void* d, int ds, void* q, int qs, ZeliSize r) {
         return zeliSqrIntegral_8u32f64f_C1R(s8(s), ss, f32(d), ds, f64(q), qs, r, 0, 0);
       }},
      {"TiltedIntegral_8u32f", 1, 4, 0, 2,
       [=](const void* s, int ss, void* d, int ds, void*, int, ZeliSize r) {
         return zeliTiltedIntegral_8u32f_C1R(s8(s), ss, f32(d), ds, r, 0);
       }},
      {"TiltedIntegral_8u32s", 1, 4, 0, 2,
       [=](const void* s, int ss, void* d, int ds, void*, int, ZeliSize r) {
         return zeliTiltedIntegral_8u32s_C1R(s8(s), ss, i32(d), ds, r, 0);
       }},
      {"TiltedSqrIntegral_8u32s", 1, 4, 4, 2,
       [=](const void* s, int ss, void* d, int ds, void* q, int qs, ZeliSize r) {
         return zeliTiltedSqrIntegral_8u32s_C1R(s8(s), ss, i32(d), ds, i32(q), qs, r, 0, 0);
       }},
      {"TiltedSqrIntegral_8u32s64f", 1, 4, 8, 2,
       [=](const void* s, int ss, void* d, int ds, void* q, int qs, ZeliSize r) {
         return zeliTiltedSqrIntegral_8u32s64f_C1R(s8(s), ss, i32(d), ds, f64(q), qs, r, 0, 0);
       }},
      {"TiltedSqrIntegral_8u32f64f", 1, 4, 8, 2,
       [=](const void* s, int ss, void* d, int ds, void* q, int qs, ZeliSize r) {
         return zeliTiltedSqrIntegral_8u32f64f_C1R(s8(s), ss, f32(d), ds, f64(q), qs, r, 0, 0);
       }},
  };
}

TEST(IntegralChecks, CodesInTheFixedOrderAndNothingWritten) {
  const int w = 5, h = 3;
  alignas(16) static uint8_t srcBuf[4096], dstBuf[4096], sqrBuf[4096];
  for (const Member& m : members()) {
    SCOPED_TRACE(m.name);
    const int ss = m.srcBytes * w, ds = m.dstBytes * (w + m.extraCols);
    const int qs = m.sqrBytes ? m.sqrBytes * (w + m.extraCols) : 0;
    void* sqr = m.sqrBytes ? sqrBuf : nullptr;
    struct Case {
      const void* src;
      int srcStep;
      void* dst;
      int dstStep;
      void* sqr;
      int sqrStep;
      ZeliSize roi;
      ZelStatus want;
    };
    std::vector<Case> cases = {
        {nullptr, ss, dstBuf, ds, sqr, qs, {0, h}, zelStatusNullPointer},
        {srcBuf, ss, nullptr, ds, sqr, qs, {w, -1}, zelStatusNullPointer},
        {srcBuf, ss, dstBuf, ds, sqr, qs, {0, h}, zelStatusBadSize},
        {srcBuf, ss, dstBuf, ds, sqr, qs, {w, 0}, zelStatusBadSize},
        {srcBuf, ss - 1, dstBuf, ds + 2, sqr, qs, {w, h}, zelStatusBadStep},
        {srcBuf, ss, dstBuf, ds - m.dstBytes, sqr, qs + 2, {w, h}, zelStatusBadStep},
        {srcBuf, -ss, dstBuf, ds, sqr, qs, {w, h}, zelStatusBadStep},
        {srcBuf, ss, dstBuf, ds + 2, sqr, qs, {w, h}, zelStatusMisalignedStep},
        {srcBuf, ss, dstBuf, ds, sqr, qs, {w, h}, zelStatusOk},
        {srcBuf, ss + 1, dstBuf, ds + m.dstBytes, sqr, qs, {w, h},
         m.srcBytes == 1 ? zelStatusOk : zelStatusMisalignedStep},
        {srcBuf, ss + 2, dstBuf, ds, sqr, qs, {w, h},
         m.srcBytes == 1 ? zelStatusOk : zelStatusMisalignedStep},
    };
    if (m.sqrBytes) {
      cases.push_back({srcBuf, ss, dstBuf, ds, nullptr, qs, {-3, h}, zelStatusNullPointer});
      cases.push_back({srcBuf, ss, dstBuf, ds, sqr, qs - m.sqrBytes, {w, h}, zelStatusBadStep});
      cases.push_back({srcBuf, ss, dstBuf, ds, sqr, qs + m.sqrBytes / 2, {w, h},
                       zelStatusMisalignedStep});
      cases.push_back({srcBuf, ss, dstBuf, ds, sqr, qs + 2, {w, h}, zelStatusMisalignedStep});
    }
    for (size_t i = 0; i < cases.size(); ++i) {
      const Case& c = cases[i];
      std::memset(dstBuf, 0x5A, sizeof dstBuf);
      std::memset(sqrBuf, 0x5A, sizeof sqrBuf);
      EXPECT_EQ(m.call(c.src, c.srcStep, c.dst, c.dstStep, c.sqr, c.sqrStep, c.roi), c.want)
          << "case " << i;
      if (c.want != zelStatusOk) {
        bool untouched = true;
        for (size_t k = 0; k < sizeof dstBuf; ++k) untouched &= dstBuf[k] == 0x5A && sqrBuf[k] == 0x5A;
        EXPECT_TRUE(untouched) << "case " << i;
      }
    }
  }
}

}  // namespace
