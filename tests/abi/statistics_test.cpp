// The masked statistics against their definitions (statistics_reference.h),
// bit for bit, over random sizes, steps, start offsets, masks (random,
// empty, full, one pixel) and channels of interest; the zero-divisor rule of
// the relative norms; and the argument checks with their codes and order.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>

#include "abi/statistics_reference.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::randomLayout;
using zeltest::sameBits;
using zeltest::StatResults;
using zeltest::TestImage;

// Every member of one element type, by shape.
template <typename T>
struct Members {
  using Norm = ZelStatus(ZELCV_CALL*)(const T*, int, ZeliSize, Zel64f*);
  using NormM = ZelStatus(ZELCV_CALL*)(const T*, int, const Zel8u*, int, ZeliSize, Zel64f*);
  using NormC = ZelStatus(ZELCV_CALL*)(const T*, int, const Zel8u*, int, ZeliSize, int, Zel64f*);
  using Diff = ZelStatus(ZELCV_CALL*)(const T*, int, const T*, int, ZeliSize, Zel64f*);
  using DiffM = ZelStatus(ZELCV_CALL*)(const T*, int, const T*, int, const Zel8u*, int, ZeliSize, Zel64f*);
  using DiffC = ZelStatus(ZELCV_CALL*)(const T*, int, const T*, int, const Zel8u*, int, ZeliSize, int, Zel64f*);
  using Mean = ZelStatus(ZELCV_CALL*)(const T*, int, ZeliSize, Zel64f*);
  using MeanM = ZelStatus(ZELCV_CALL*)(const T*, int, const Zel8u*, int, ZeliSize, Zel64f*);
  using MeanC = ZelStatus(ZELCV_CALL*)(const T*, int, const Zel8u*, int, ZeliSize, int, Zel64f*);
  using Std = ZelStatus(ZELCV_CALL*)(const T*, int, ZeliSize, Zel64f*, Zel64f*);
  using StdM = ZelStatus(ZELCV_CALL*)(const T*, int, const Zel8u*, int, ZeliSize, Zel64f*, Zel64f*);
  using StdC = ZelStatus(ZELCV_CALL*)(const T*, int, const Zel8u*, int, ZeliSize, int, Zel64f*, Zel64f*);
  using MinMax = ZelStatus(ZELCV_CALL*)(const T*, int, ZeliSize, Zel64f*, Zel64f*, ZeliPoint*, ZeliPoint*);
  using MinMaxM = ZelStatus(ZELCV_CALL*)(const T*, int, const Zel8u*, int, ZeliSize, Zel64f*, Zel64f*, ZeliPoint*,
                                         ZeliPoint*);
  using MinMaxC = ZelStatus(ZELCV_CALL*)(const T*, int, const Zel8u*, int, ZeliSize, int, Zel64f*, Zel64f*,
                                         ZeliPoint*, ZeliPoint*);
  Norm norm[3];  // Inf, L1, L2; null where the type has no unmasked member
  NormM normM[3];
  NormC normC[3];
  Diff diff[3];
  DiffM diffM[3];
  DiffC diffC[3];
  Diff rel[3];
  DiffM relM[3];
  Mean mean;
  MeanM meanM;
  MeanC meanC;
  Std std;
  StdM stdM;
  StdC stdC;
  MinMax minMax;
  MinMaxM minMaxM;
  MinMaxC minMaxC;
};

#define MASKED(Op, tn, sfx) {zeli##Op##_Inf_##tn##_##sfx, zeli##Op##_L1_##tn##_##sfx, zeli##Op##_L2_##tn##_##sfx}
#define PLAIN(tn)                                                                                      \
  MASKED(Norm, tn, C1R), MASKED(Norm, tn, C1MR), MASKED(Norm, tn, C3CMR), MASKED(NormDiff, tn, C1R), \
      MASKED(NormDiff, tn, C1MR), MASKED(NormDiff, tn, C3CMR), MASKED(NormRel, tn, C1R),             \
      MASKED(NormRel, tn, C1MR), zeliMean_##tn##_C1R, zeliMean_##tn##_C1MR, zeliMean_##tn##_C3CMR,   \
      zeliMean_StdDev_##tn##_C1R, zeliMean_StdDev_##tn##_C1MR, zeliMean_StdDev_##tn##_C3CMR,         \
      zeliMinMaxIndx_##tn##_C1R, zeliMinMaxIndx_##tn##_C1MR, zeliMinMaxIndx_##tn##_C3CMR

template <typename T> Members<T> members();
template <> Members<Zel8u> members() { return {PLAIN(8u)}; }
template <> Members<Zel16u> members() { return {PLAIN(16u)}; }
template <> Members<Zel32f> members() { return {PLAIN(32f)}; }
// 8s has masked members only.
template <> Members<Zel8s> members() {
  return {{nullptr, nullptr, nullptr}, MASKED(Norm, 8s, C1MR), MASKED(Norm, 8s, C3CMR), {nullptr, nullptr, nullptr},
          MASKED(NormDiff, 8s, C1MR), MASKED(NormDiff, 8s, C3CMR), {nullptr, nullptr, nullptr},
          MASKED(NormRel, 8s, C1MR), nullptr, zeliMean_8s_C1MR, zeliMean_8s_C3CMR, nullptr,
          zeliMean_StdDev_8s_C1MR, zeliMean_StdDev_8s_C3CMR, nullptr, zeliMinMaxIndx_8s_C1MR,
          zeliMinMaxIndx_8s_C3CMR};
}

enum class MaskKind { None, Random, Sparse, Empty, Full, OnePixel };

template <typename T>
void fillValues(TestImage<T>& im, std::mt19937& rng, bool extremes) {
  if constexpr (std::is_floating_point<T>::value) {
    im.fillRandom(rng, -1000.0f, 1000.0f);
  } else {
    im.fillRandom(rng, std::numeric_limits<T>::min(), std::numeric_limits<T>::max());
  }
  if (extremes)
    for (int y = 0; y < im.height(); ++y)
      for (int i = 0; i < im.width() * im.channels(); ++i)
        if (rng() % 3 == 0) im.row(y)[i] = rng() % 2 ? std::numeric_limits<T>::max() : std::numeric_limits<T>::lowest();
}

void fillMask(TestImage<uint8_t>& m, std::mt19937& rng, MaskKind kind) {
  const int onePixel = int(rng() % uint32_t(m.width() * m.height()));
  for (int y = 0; y < m.height(); ++y)
    for (int x = 0; x < m.width(); ++x) {
      uint8_t v = 0;
      switch (kind) {
        case MaskKind::Random: v = rng() % 2 ? uint8_t(1 + rng() % 255) : 0; break;
        case MaskKind::Sparse: v = rng() % 29 == 0 ? 0x80 : 0; break;
        case MaskKind::Full: v = 0xFF; break;
        case MaskKind::OnePixel: v = y * m.width() + x == onePixel ? 7 : 0; break;
        default: break;
      }
      m.at(x, y) = v;
    }
}

// Runs every member of type T that fits (channels, mask) on one case and
// compares it with the reference.
template <typename T>
void checkCase(std::mt19937& rng, int w, int h, bool three, MaskKind maskKind, bool extremes) {
  const Members<T> f = members<T>();
  const int channels = three ? 3 : 1;
  const int esize = int(sizeof(T));
  auto layout = [&](int ch, int elem) {
    Layout l = randomLayout(rng, 1, 1, ch, elem, elem);
    l.width = w;
    l.height = h;
    return l;
  };
  TestImage<T> a(layout(channels, esize)), b(layout(channels, esize));
  TestImage<uint8_t> m(layout(1, 1));
  fillValues(a, rng, extremes);
  fillValues(b, rng, extremes);
  if (rng() % 4 == 0)  // some pixels equal, so that differences of 0 occur
    for (int y = 0; y < h; ++y)
      for (int i = 0; i < w * channels; ++i)
        if (rng() % 2) b.row(y)[i] = a.row(y)[i];
  const bool masked = maskKind != MaskKind::None;
  if (masked) fillMask(m, rng, maskKind);
  const int coi = three ? 1 + int(rng() % 3) : 0;
  const StatResults r = zeltest::referenceStats(a, b, masked ? &m : nullptr, three ? coi - 1 : 0);
  const ZeliSize roi = {w, h};
  SCOPED_TRACE(testing::Message() << w << " x " << h << " channels " << channels << " coi " << coi << " mask "
                                  << int(maskKind) << " steps " << a.step() << "/" << b.step());

  for (int k = 0; k < 3; ++k) {
    Zel64f v = -1, d = -1, rel = -1;
    ZelStatus sv, sd, sr = zelStatusOk;
    if (three) {
      sv = f.normC[k](a.data(), a.step(), m.data(), m.step(), roi, coi, &v);
      sd = f.diffC[k](a.data(), a.step(), b.data(), b.step(), m.data(), m.step(), roi, coi, &d);
    } else if (masked) {
      sv = f.normM[k](a.data(), a.step(), m.data(), m.step(), roi, &v);
      sd = f.diffM[k](a.data(), a.step(), b.data(), b.step(), m.data(), m.step(), roi, &d);
      sr = f.relM[k](a.data(), a.step(), b.data(), b.step(), m.data(), m.step(), roi, &rel);
    } else {
      if (!f.norm[k]) return;
      sv = f.norm[k](a.data(), a.step(), roi, &v);
      sd = f.diff[k](a.data(), a.step(), b.data(), b.step(), roi, &d);
      sr = f.rel[k](a.data(), a.step(), b.data(), b.step(), roi, &rel);
    }
    SCOPED_TRACE(testing::Message() << "norm " << k);
    EXPECT_EQ(sv, zelStatusOk);
    EXPECT_EQ(sd, zelStatusOk);
    EXPECT_TRUE(sameBits(v, r.norm[k])) << v << " vs " << r.norm[k];
    EXPECT_TRUE(sameBits(d, r.normDiff[k])) << d << " vs " << r.normDiff[k];
    if (!three) {
      EXPECT_EQ(sr, r.normB[k] == 0 ? zelStatusDivByZero : zelStatusOk);
      const double want = zeltest::relativeNorm(r.normDiff[k], r.normB[k]);
      EXPECT_TRUE(sameBits(rel, want)) << rel << " vs " << want;
    }
  }

  Zel64f mean = -1, mean2 = -1, dev = -1, lo = -1, hi = -1;
  ZeliPoint loAt = {-7, -7}, hiAt = {-7, -7};
  ZelStatus s1, s2, s3;
  if (three) {
    s1 = f.meanC(a.data(), a.step(), m.data(), m.step(), roi, coi, &mean);
    s2 = f.stdC(a.data(), a.step(), m.data(), m.step(), roi, coi, &mean2, &dev);
    s3 = f.minMaxC(a.data(), a.step(), m.data(), m.step(), roi, coi, &lo, &hi, &loAt, &hiAt);
  } else if (masked) {
    s1 = f.meanM(a.data(), a.step(), m.data(), m.step(), roi, &mean);
    s2 = f.stdM(a.data(), a.step(), m.data(), m.step(), roi, &mean2, &dev);
    s3 = f.minMaxM(a.data(), a.step(), m.data(), m.step(), roi, &lo, &hi, &loAt, &hiAt);
  } else {
    s1 = f.mean(a.data(), a.step(), roi, &mean);
    s2 = f.std(a.data(), a.step(), roi, &mean2, &dev);
    s3 = f.minMax(a.data(), a.step(), roi, &lo, &hi, &loAt, &hiAt);
  }
  EXPECT_EQ(s1 | s2 | s3, zelStatusOk);
  EXPECT_TRUE(sameBits(mean, r.mean)) << mean << " vs " << r.mean;
  EXPECT_TRUE(sameBits(mean2, r.mean)) << mean2 << " vs " << r.mean;
  EXPECT_TRUE(sameBits(dev, r.stdDev)) << dev << " vs " << r.stdDev;
  EXPECT_TRUE(sameBits(lo, r.minVal)) << lo << " vs " << r.minVal;
  EXPECT_TRUE(sameBits(hi, r.maxVal)) << hi << " vs " << r.maxVal;
  EXPECT_EQ(loAt.x, r.minAt.x);
  EXPECT_EQ(loAt.y, r.minAt.y);
  EXPECT_EQ(hiAt.x, r.maxAt.x);
  EXPECT_EQ(hiAt.y, r.maxAt.y);
  EXPECT_TRUE(a.sentinelIntact() && b.sentinelIntact() && m.sentinelIntact());
}

template <typename T>
void randomCases(uint32_t seed, int count) {
  std::mt19937 rng(seed);
  const MaskKind kinds[] = {MaskKind::None,  MaskKind::Random, MaskKind::Sparse,
                            MaskKind::Empty, MaskKind::Full,   MaskKind::OnePixel};
  for (int i = 0; i < count; ++i) {
    // Mostly short rows (every head and tail), some past the vector blocks.
    const int w = rng() % 4 == 0 ? 1 + int(rng() % 300) : 1 + int(rng() % 40);
    const int h = 1 + int(rng() % 12);
    const MaskKind kind = kinds[i % 6];
    const bool three = kind != MaskKind::None && rng() % 3 == 0;
    checkCase<T>(rng, w, h, three, kind, rng() % 4 == 0);
  }
}

TEST(Statistics, Members8uMatchDefinitions) { randomCases<Zel8u>(1901, 240); }
TEST(Statistics, Members8sMatchDefinitions) { randomCases<Zel8s>(1902, 180); }
TEST(Statistics, Members16uMatchDefinitions) { randomCases<Zel16u>(1903, 180); }
TEST(Statistics, Members32fMatchDefinitions) { randomCases<Zel32f>(1904, 240); }

// 8u squares are gathered in 32-bit lanes and widened in chunks: a row far
// longer than a chunk, at the largest values.
TEST(Statistics, LongBrightRowsStayExact) {
  const int w = 300007;
  TestImage<uint8_t> a(Layout{w, 2, 1, 0, 3});
  for (int y = 0; y < 2; ++y)
    for (int x = 0; x < w; ++x) a.at(x, y) = 255;
  Zel64f l2 = 0, mean = 0, dev = -1;
  ASSERT_EQ(zeliNorm_L2_8u_C1R(a.data(), a.step(), {w, 2}, &l2), zelStatusOk);
  EXPECT_EQ(l2, std::sqrt(double(2 * w) * 65025.0));
  ASSERT_EQ(zeliMean_StdDev_8u_C1R(a.data(), a.step(), {w, 2}, &mean, &dev), zelStatusOk);
  EXPECT_EQ(mean, 255.0);
  EXPECT_EQ(dev, 0.0);
}

// NaNs are never extrema and the infinity norm skips them; infinities and
// signed zeros are values like any other.
TEST(Statistics, FloatSpecialValues) {
  const float nan = std::numeric_limits<float>::quiet_NaN(), inf = std::numeric_limits<float>::infinity();
  TestImage<float> a(Layout{21, 3, 1, 4, 4});
  for (int y = 0; y < 3; ++y)
    for (int x = 0; x < 21; ++x) a.at(x, y) = nan;
  Zel64f lo = 1, hi = 1, n = 1;
  ZeliPoint loAt, hiAt;
  ASSERT_EQ(zeliMinMaxIndx_32f_C1R(a.data(), a.step(), {21, 3}, &lo, &hi, &loAt, &hiAt), zelStatusOk);
  EXPECT_EQ(lo, 0.0);
  EXPECT_EQ(loAt.x, -1);
  EXPECT_EQ(hiAt.y, -1);
  ASSERT_EQ(zeliNorm_Inf_32f_C1R(a.data(), a.step(), {21, 3}, &n), zelStatusOk);
  EXPECT_EQ(n, 0.0);
  a.at(13, 1) = -inf;
  a.at(2, 2) = 5.0f;
  a.at(19, 2) = -inf;
  a.at(20, 0) = -0.0f;
  ASSERT_EQ(zeliMinMaxIndx_32f_C1R(a.data(), a.step(), {21, 3}, &lo, &hi, &loAt, &hiAt), zelStatusOk);
  EXPECT_EQ(lo, -HUGE_VAL);
  EXPECT_EQ(hi, 5.0);
  EXPECT_EQ(loAt.x, 13);
  EXPECT_EQ(loAt.y, 1);
  EXPECT_EQ(hiAt.x, 2);
  EXPECT_EQ(hiAt.y, 2);
  ASSERT_EQ(zeliNorm_Inf_32f_C1R(a.data(), a.step(), {21, 3}, &n), zelStatusOk);
  EXPECT_EQ(n, HUGE_VAL);
}

TEST(Statistics, RelativeNormOfZeroDivisor) {
  TestImage<uint8_t> a(Layout{33, 2, 1, 0, 0}), b(Layout{33, 2, 1, 0, 0});
  Zel64f v = 0;
  ASSERT_EQ(zeliNormRel_L1_8u_C1R(a.data(), a.step(), b.data(), b.step(), {33, 2}, &v), zelStatusDivByZero);
  EXPECT_TRUE(sameBits(v, zeltest::relativeNorm(0, 0)));
  a.at(5, 1) = 3;
  ASSERT_EQ(zeliNormRel_Inf_8u_C1R(a.data(), a.step(), b.data(), b.step(), {33, 2}, &v), zelStatusDivByZero);
  EXPECT_EQ(v, HUGE_VAL);
  b.at(0, 0) = 2;
  ASSERT_EQ(zeliNormRel_Inf_8u_C1R(a.data(), a.step(), b.data(), b.step(), {33, 2}, &v), zelStatusOk);
  EXPECT_EQ(v, 1.5);
}

// Pointers before sizes before steps before alignment before the channel of
// interest; nothing written on an error.
TEST(Statistics, ArgumentChecksInOrder) {
  TestImage<float> a(Layout{8, 4, 3, 0, 0}), b(Layout{8, 4, 3, 0, 0});
  TestImage<uint8_t> m(Layout{8, 4, 1, 1, 0});
  const int as = a.step(), bs = b.step(), ms = m.step();
  Zel64f v = 42.0, v2 = 42.0;
  ZeliPoint p;
  EXPECT_EQ(zeliNorm_L1_32f_C3CMR(nullptr, as, m.data(), ms, {0, 4}, 1, &v), zelStatusNullPointer);
  EXPECT_EQ(zeliNorm_L1_32f_C3CMR(a.data(), as, nullptr, ms, {8, 4}, 1, &v), zelStatusNullPointer);
  EXPECT_EQ(zeliNorm_L1_32f_C3CMR(a.data(), as, m.data(), ms, {8, 4}, 1, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliNormDiff_L2_32f_C3CMR(a.data(), as, nullptr, bs, m.data(), ms, {8, 4}, 9, &v), zelStatusNullPointer);
  EXPECT_EQ(zeliMinMaxIndx_32f_C1R(a.data(), as, {8, 4}, &v, &v2, &p, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliMean_StdDev_32f_C1R(a.data(), as, {8, 4}, nullptr, &v2), zelStatusNullPointer);
  EXPECT_EQ(zeliNorm_L1_32f_C3CMR(a.data(), as, m.data(), ms, {0, 4}, 1, &v), zelStatusBadSize);
  EXPECT_EQ(zeliNorm_L1_32f_C3CMR(a.data(), as, m.data(), ms, {8, -1}, 1, &v), zelStatusBadSize);
  // A C3 step is compared with 3 x 4 x width bytes; the mask's with the width.
  EXPECT_EQ(zeliNorm_L1_32f_C3CMR(a.data(), 95, m.data(), ms, {8, 4}, 0, &v), zelStatusBadStep);
  EXPECT_EQ(zeliNorm_L1_32f_C3CMR(a.data(), 96, m.data(), 7, {8, 4}, 0, &v), zelStatusBadStep);
  EXPECT_EQ(zeliNormDiff_L1_32f_C3CMR(a.data(), 96, b.data(), 94, m.data(), 8, {8, 4}, 0, &v), zelStatusBadStep);
  EXPECT_EQ(zeliNorm_L1_32f_C3CMR(a.data(), 98, m.data(), ms, {8, 4}, 0, &v), zelStatusMisalignedStep);
  EXPECT_EQ(zeliNormDiff_L1_32f_C3CMR(a.data(), 96, b.data(), 98, m.data(), 8, {8, 4}, 0, &v),
            zelStatusMisalignedStep);
  // An odd mask step is fine.
  EXPECT_EQ(zeliNorm_L1_32f_C3CMR(a.data(), as, m.data(), 9, {8, 3}, 0, &v), zelStatusBadChannelOfInterest);
  EXPECT_EQ(zeliMean_32f_C3CMR(a.data(), as, m.data(), ms, {8, 4}, 4, &v), zelStatusBadChannelOfInterest);
  EXPECT_EQ(zeliMinMaxIndx_32f_C3CMR(a.data(), as, m.data(), ms, {8, 4}, -1, &v, &v2, &p, &p),
            zelStatusBadChannelOfInterest);
  EXPECT_EQ(v, 42.0);
  EXPECT_EQ(v2, 42.0);
  // 16u: steps must be even; 8u and 8s steps may be anything.
  TestImage<Zel16u> u(Layout{5, 2, 1, 1, 0});
  EXPECT_EQ(zeliNorm_Inf_16u_C1R(u.data(), 11, {5, 2}, &v), zelStatusMisalignedStep);
  TestImage<Zel8s> s8(Layout{5, 2, 1, 0, 0});
  EXPECT_EQ(zeliMean_8s_C1MR(s8.data(), 7, m.data(), ms, {5, 2}, &v), zelStatusOk);
}

}  // namespace
