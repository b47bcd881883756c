// Corner measures, peaks, FAST, Hough lines and line suppression through
// their exports, against the plain references over random sizes, steps,
// start offsets, borders and parameters, with buffers of exactly the
// reported size and guard bytes around everything written.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <random>
#include <vector>

#include "features_reference.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using featref::Plain;
using zeltest::Layout;
using zeltest::TestImage;

// Exactly `bytes` at an odd distance from an alignment boundary, with guards.
class Guarded {
 public:
  Guarded(int bytes, int offset) : bytes_(bytes), block_(size_t(bytes) + 128, zeltest::kSentinel) {
    data_ = block_.data() + 32 + offset;
  }
  Zel8u* data() { return data_; }
  bool intact() const {
    for (const Zel8u* p = block_.data(); p < data_; ++p)
      if (*p != zeltest::kSentinel) return false;
    for (const Zel8u* p = data_ + bytes_; p < block_.data() + block_.size(); ++p)
      if (*p != zeltest::kSentinel) return false;
    return true;
  }

 private:
  int bytes_;
  std::vector<Zel8u> block_;
  Zel8u* data_;
};

template <typename T>
Plain<T> plainOf(const TestImage<T>& im) {
  Plain<T> p{im.width(), im.height(), std::vector<T>(size_t(im.width()) * im.height())};
  for (int y = 0; y < im.height(); ++y)
    for (int x = 0; x < im.width(); ++x) p.at(x, y) = im.at(x, y);
  return p;
}

// Smooth blobs plus noise: corners, edges and flat parts at once.
void fillScene(TestImage<Zel8u>& im, std::mt19937& rng, int noise) {
  std::uniform_int_distribution<int> n(-noise, noise);
  const int cx = int(rng() % 97), cy = int(rng() % 89);
  for (int y = 0; y < im.height(); ++y)
    for (int x = 0; x < im.width(); ++x) {
      int v = ((x + cx) / 7 + (y + cy) / 5) % 2 ? 180 : 60;
      if ((x - cx) * (x - cx) + (y - cy) * (y - cy) < 150) v = 250;
      im.at(x, y) = Zel8u(std::clamp(v + n(rng), 0, 255));
    }
}

const int kBorders[] = {zelBorderConstant, zelBorderReplicate, zelBorderWrap, zelBorderMirror,
                        zelBorderMirrorWithEdge};

struct CornerCase {
  int filter, mask, block, border;
};

CornerCase randomCase(std::mt19937& rng) {
  CornerCase c;
  const int kind = int(rng() % 3);
  c.filter = kind == 2 ? zelFilterScharr : zelFilterSobel;
  c.mask = kind == 1 ? zelMaskSize5x5 : zelMaskSize3x3;
  c.block = 1 + int(rng() % 7);
  c.border = kBorders[rng() % 5];
  return c;
}

template <typename T>
ZelStatus callCorner(featref::Measure m, const TestImage<T>& src, TestImage<Zel32f>& dst, const CornerCase& c,
                     T value, float k, Zel8u* buffer) {
  const ZeliSize roi = src.size();
  if constexpr (sizeof(T) == 1) {
    if (m == featref::Measure::kMinEigenVal)
      return zeliMinEigenVal_8u32f_C1R(src.data(), src.step(), dst.data(), dst.step(), roi, c.filter, c.mask, c.block,
                                       c.border, value, buffer);
    if (m == featref::Measure::kHarris)
      return zeliHarrisCorner_8u32f_C1R(src.data(), src.step(), dst.data(), dst.step(), roi, c.filter, c.mask, c.block,
                                        k, c.border, value, buffer);
    return zeliEigenValsVecs_8u32f_C1R(src.data(), src.step(), dst.data(), dst.step(), roi, c.filter, c.mask,
                                       c.block, c.border, value, buffer);
  } else {
    if (m == featref::Measure::kMinEigenVal)
      return zeliMinEigenVal_32f_C1R(src.data(), src.step(), dst.data(), dst.step(), roi, c.filter, c.mask, c.block,
                                     c.border, value, buffer);
    if (m == featref::Measure::kHarris)
      return zeliHarrisCorner_32f_C1R(src.data(), src.step(), dst.data(), dst.step(), roi, c.filter, c.mask, c.block,
                                      k, c.border, value, buffer);
    return zeliEigenValsVecs_32f_C1R(src.data(), src.step(), dst.data(), dst.step(), roi, c.filter, c.mask, c.block,
                                     c.border, value, buffer);
  }
}

int cornerBufferSize(featref::Measure m, bool eightBit, ZeliSize roi, int mask, int block) {
  int bytes = -1;
  ZelStatus s;
  if (m == featref::Measure::kHarris) s = zeliHarrisCornerGetBufferSize(roi, mask, block, &bytes);
  else if (m == featref::Measure::kMinEigenVal)
    s = eightBit ? zeliMinEigenValGetBufferSize_8u32f_C1R(roi, mask, block, &bytes)
                 : zeliMinEigenValGetBufferSize_32f_C1R(roi, mask, block, &bytes);
  else
    s = eightBit ? zeliEigenValsVecsGetBufferSize_8u32f_C1R(roi, mask, block, &bytes)
                 : zeliEigenValsVecsGetBufferSize_32f_C1R(roi, mask, block, &bytes);
  EXPECT_EQ(s, zelStatusOk);
  return bytes;
}

template <typename T>
void cornerAgainstReference(featref::Measure m, int rounds, unsigned seed) {
  std::mt19937 rng(seed);
  for (int round = 0; round < rounds; ++round) {
    const CornerCase c = randomCase(rng);
    Layout layout = zeltest::randomLayout(rng, 45, 23, 1, sizeof(T), sizeof(T));
    TestImage<T> src(layout);
    if constexpr (sizeof(T) == 1) {
      if (round % 2) fillScene(src, rng, 20);
      else src.fillRandom(rng, 0, 255);
    } else {
      src.fillRandom(rng, -100.0, 300.0);
    }
    const int per = m == featref::Measure::kEigenValsVecs ? 6 : 1;
    Layout dl = zeltest::randomLayout(rng, 1, 1, per, 4, 4);
    dl.width = layout.width;
    dl.height = layout.height;
    TestImage<Zel32f> dst(dl);
    const T value = T(rng() % 200);
    const float k = 0.04f + float(rng() % 10) * 0.01f;
    const int bytes = cornerBufferSize(m, sizeof(T) == 1, src.size(), c.mask, c.block);
    Guarded buffer(bytes, int(rng() % 16));
    ASSERT_EQ(callCorner(m, src, dst, c, value, k, buffer.data()), zelStatusOk);
    ASSERT_TRUE(buffer.intact());
    ASSERT_TRUE(dst.sentinelIntact());
    const std::vector<float> expected =
        featref::cornerResponse(plainOf(src), c.filter, c.mask, c.block, c.border & 15, value, m, k);
    for (int y = 0; y < layout.height; ++y)
      for (int x = 0; x < layout.width * per; ++x) {
        const float got = dst.row(y)[x], want = expected[size_t(y) * layout.width * per + x];
        ASSERT_TRUE(std::memcmp(&got, &want, 4) == 0 || (std::isnan(got) && std::isnan(want)))
            << "round " << round << " x=" << x << " y=" << y << " got " << got << " want " << want << " size "
            << layout.width << "x" << layout.height << " block " << c.block << " mask " << c.mask << " border "
            << c.border;
      }
  }
}

TEST(FeaturesCorners, MinEigenValMatchesReference) {
  cornerAgainstReference<Zel8u>(featref::Measure::kMinEigenVal, 120, 11);
  cornerAgainstReference<Zel32f>(featref::Measure::kMinEigenVal, 120, 12);
}

TEST(FeaturesCorners, HarrisMatchesReference) {
  cornerAgainstReference<Zel8u>(featref::Measure::kHarris, 120, 21);
  cornerAgainstReference<Zel32f>(featref::Measure::kHarris, 120, 22);
}

TEST(FeaturesCorners, EigenValsVecsMatchesReference) {
  cornerAgainstReference<Zel8u>(featref::Measure::kEigenValsVecs, 60, 31);
  cornerAgainstReference<Zel32f>(featref::Measure::kEigenValsVecs, 60, 32);
}

TEST(FeaturesCorners, Checks) {
  std::vector<Zel8u> src(64 * 8, 7);
  std::vector<Zel32f> dst(64 * 8, -1.0f);
  std::vector<Zel8u> buffer(1 << 16);
  const ZeliSize roi = {16, 8};
  auto call = [&](int filter, int mask, int block, int border, Zel32f k) {
    return zeliHarrisCorner_8u32f_C1R(src.data(), 16, dst.data(), 64, roi, filter, mask, block, k, border, 0,
                                      buffer.data());
  };
  EXPECT_EQ(call(zelFilterScharr, zelMaskSize5x5, 3, zelBorderReplicate, 0.04f), zelStatusBadMaskSize);
  EXPECT_EQ(call(7, zelMaskSize3x3, 3, zelBorderReplicate, 0.04f), zelStatusBadMaskSize);
  EXPECT_EQ(call(zelFilterSobel, zelMaskSize3x3, 0, zelBorderReplicate, 0.04f), zelStatusBadMaskSize);
  EXPECT_EQ(call(zelFilterSobel, zelMaskSize3x3, 32, zelBorderReplicate, 0.04f), zelStatusBadMaskSize);
  EXPECT_EQ(call(zelFilterSobel, zelMaskSize3x3, 3, zelBorderInMemory, 0.04f), zelStatusBadBorder);
  EXPECT_EQ(call(zelFilterSobel, zelMaskSize3x3, 3, zelBorderReplicate | zelBorderInMemTop, 0.04f), zelStatusBadBorder);
  EXPECT_EQ(call(zelFilterSobel, zelMaskSize3x3, 3, zelBorderReplicate, NAN), zelStatusBadArgument);
  EXPECT_EQ(zeliHarrisCorner_8u32f_C1R(src.data(), 16, dst.data(), 66, roi, zelFilterSobel, zelMaskSize3x3, 3,
                                       0.04f, zelBorderReplicate, 0, buffer.data()),
            zelStatusMisalignedStep);
  for (Zel32f v : dst) ASSERT_EQ(v, -1.0f);
  int bytes = 0;
  EXPECT_EQ(zeliHarrisCornerGetBufferSize(roi, zelMaskSize3x3, 3, &bytes), zelStatusOk);
  EXPECT_EQ(bytes, (12 * 3 + 40) * 16 + 16 * 3 + 256);
  EXPECT_EQ(zeliHarrisCornerGetBufferSize({0x7FFFFFF0, 1}, zelMaskSize3x3, 3, &bytes), zelStatusBadSize);
}

// ---- peaks -----------------------------------------------------------------------

template <typename T>
std::vector<ZeliPoint> referencePeaks(const Plain<T>& p, T threshold, int norm, int border) {
  std::vector<ZeliPoint> out;
  for (int y = border; y < p.h - border; ++y)
    for (int x = border; x < p.w - border; ++x) {
      const T v = p.at(x, y);
      if (!(v > threshold)) continue;
      bool peak = true;
      for (int dy = -1; dy <= 1; ++dy)
        for (int dx = -1; dx <= 1; ++dx) {
          if ((!dx && !dy) || (norm == zelNormL1 && dx && dy)) continue;
          const int nx = x + dx, ny = y + dy;
          if (nx >= 0 && ny >= 0 && nx < p.w && ny < p.h && p.at(nx, ny) > v) peak = false;
        }
      if (peak) out.push_back({x, y});
    }
  return out;
}

template <typename T>
void peaksAgainstReference(unsigned seed) {
  std::mt19937 rng(seed);
  for (int round = 0; round < 200; ++round) {
    Layout layout = zeltest::randomLayout(rng, 40, 20, 1, 4, 4);
    TestImage<T> src(layout);
    src.fillRandom(rng, 0, 6);  // few levels: plateaus and equal neighbours
    if constexpr (std::is_floating_point<T>::value)
      if (round % 5 == 0) src.at(int(rng() % layout.width), int(rng() % layout.height)) = NAN;
    const T threshold = T(rng() % 5);
    const int norm = rng() % 2 ? zelNormL1 : zelNormInf, border = int(rng() % 3);
    const auto expected = referencePeaks(plainOf(src), threshold, norm, border);
    int bytes = 0;
    ASSERT_EQ(sizeof(T) == 4 && std::is_floating_point<T>::value
                  ? zeliFindPeaks3x3GetBufferSize_32f_C1R(layout.width, &bytes)
                  : zeliFindPeaks3x3GetBufferSize_32s_C1R(layout.width, &bytes),
              zelStatusOk);
    Guarded buffer(bytes, int(rng() % 16));
    const int capacity = round % 3 == 0 ? int(expected.size() / 2) : int(expected.size()) + 3;
    std::vector<ZeliPoint> got(size_t(capacity) + 1, ZeliPoint{-7, -7});
    int count = -1;
    ZelStatus s;
    if constexpr (std::is_floating_point<T>::value)
      s = zeliFindPeaks3x3_32f_C1R(src.data(), src.step(), src.size(), threshold, norm, border, got.data(), capacity,
                                   &count, buffer.data());
    else
      s = zeliFindPeaks3x3_32s_C1R(src.data(), src.step(), src.size(), threshold, norm, border, got.data(), capacity,
                                   &count, buffer.data());
    const size_t n = std::min(expected.size(), size_t(capacity));
    ASSERT_EQ(s, expected.size() > size_t(capacity) ? zelStatusOutputFull : zelStatusOk);
    ASSERT_EQ(count, int(n));
    ASSERT_TRUE(buffer.intact());
    for (size_t i = 0; i < n; ++i) ASSERT_TRUE(got[i].x == expected[i].x && got[i].y == expected[i].y) << i;
    ASSERT_EQ(got[n].x, -7);
  }
}

TEST(FeaturesPeaks, MatchReference) {
  peaksAgainstReference<Zel32f>(41);
  peaksAgainstReference<Zel32s>(42);
}

// ---- FAST ------------------------------------------------------------------------

TEST(FeaturesFast, MatchesReference) {
  std::mt19937 rng(51);
  int stateBytes = 0;
  ASSERT_EQ(zeliFastNGetSize(&stateBytes), zelStatusOk);
  int corners = 0;
  for (int round = 0; round < 150; ++round) {
    // Widths up to 110: rows of one, two and three 32-centre blocks with an
    // overlapping last block, and rows too narrow for any block.
    Layout layout = zeltest::randomLayout(rng, 110, 30, 1, 1, 1);
    TestImage<Zel8u> src(layout);
    if (round % 2) fillScene(src, rng, 30);
    else src.fillRandom(rng, 0, 255);
    const int radius = 1 + int(rng() % 3), n = 4 * radius + 4;
    const int arc = n / 2 + 1 + int(rng() % (n / 2));
    const int t = int(rng() % 60), suppress = int(rng() % 2);
    Guarded state(stateBytes, int(rng() % 16));
    ASSERT_EQ(zeliFastNInit(radius, arc, t, suppress, reinterpret_cast<ZeliFastNState*>(state.data())), zelStatusOk);
    int bytes = 0;
    ASSERT_EQ(zeliFastNGetBufferSize(src.size(), &bytes), zelStatusOk);
    Guarded buffer(bytes, int(rng() % 16));
    TestImage<Zel8u> corner(zeltest::randomLayout(rng, 1, 1, 1, 1, 1)), score(zeltest::randomLayout(rng, 1, 1, 1, 1));
    Layout cl = layout;
    cl.padBytes = int(rng() % 9);
    corner = TestImage<Zel8u>(cl);
    cl.offsetBytes = int(rng() % 16);
    score = TestImage<Zel8u>(cl);
    ASSERT_EQ(zeliFastN_8u_C1R(src.data(), src.step(), corner.data(), corner.step(), score.data(), score.step(),
                               src.size(), reinterpret_cast<const ZeliFastNState*>(state.data()), buffer.data()),
              zelStatusOk);
    ASSERT_TRUE(buffer.intact() && state.intact() && corner.sentinelIntact() && score.sentinelIntact());
    Plain<Zel8u> wantCorner, wantScore;
    featref::fast(plainOf(src), radius, arc, t, suppress != 0, wantCorner, wantScore);
    for (int y = 0; y < layout.height; ++y)
      for (int x = 0; x < layout.width; ++x) {
        ASSERT_EQ(corner.at(x, y), wantCorner.at(x, y)) << "round " << round << " x=" << x << " y=" << y;
        ASSERT_EQ(score.at(x, y), wantScore.at(x, y)) << "round " << round << " x=" << x << " y=" << y;
        corners += corner.at(x, y) != 0;
      }
    // The list: raster order, scores alongside, capacity honoured.
    std::vector<ZeliPoint> points;
    std::vector<Zel8u> scores;
    for (int y = 0; y < layout.height; ++y)
      for (int x = 0; x < layout.width; ++x)
        if (wantCorner.at(x, y)) {
          points.push_back({x, y});
          scores.push_back(wantScore.at(x, y));
        }
    const int capacity = round % 4 == 0 ? int(points.size()) / 2 : int(points.size()) + 1;
    std::vector<ZeliPoint> gotPoints(size_t(capacity) + 1, ZeliPoint{-1, -1});
    std::vector<Zel8u> gotScores(size_t(capacity) + 1, 77);
    int count = -1;
    const ZelStatus s = zeliFastN2DToVec_8u(corner.data(), corner.step(), score.data(), score.step(), src.size(),
                                            gotPoints.data(), gotScores.data(), capacity, &count);
    ASSERT_EQ(s, int(points.size()) > capacity ? zelStatusOutputFull : zelStatusOk);
    ASSERT_EQ(count, std::min(capacity, int(points.size())));
    for (int i = 0; i < count; ++i) {
      ASSERT_TRUE(gotPoints[i].x == points[i].x && gotPoints[i].y == points[i].y);
      ASSERT_EQ(gotScores[i], scores[i]);
    }
    ASSERT_EQ(gotScores[size_t(count)], 77);
  }
  EXPECT_GT(corners, 200);  // the scenes do have corners
}

TEST(FeaturesFast, Checks) {
  int bytes = 0;
  ASSERT_EQ(zeliFastNGetSize(&bytes), zelStatusOk);
  std::vector<Zel8u> state(size_t(bytes), 0);
  auto* st = reinterpret_cast<ZeliFastNState*>(state.data());
  EXPECT_EQ(zeliFastNInit(4, 9, 10, 1, st), zelStatusBadArgument);
  EXPECT_EQ(zeliFastNInit(3, 8, 10, 1, st), zelStatusBadArgument);
  EXPECT_EQ(zeliFastNInit(3, 17, 10, 1, st), zelStatusBadArgument);
  EXPECT_EQ(zeliFastNInit(1, 5, 256, 1, st), zelStatusBadArgument);
  EXPECT_EQ(zeliFastNInit(2, 7, 10, 2, st), zelStatusBadArgument);
  std::vector<Zel8u> img(16 * 16, 9), out(16 * 16, 3), buffer(4096);
  // A block that Init never built.
  EXPECT_EQ(zeliFastN_8u_C1R(img.data(), 16, out.data(), 16, out.data(), 16, {16, 16}, st, buffer.data()),
            zelStatusBadContext);
  for (Zel8u v : out) ASSERT_EQ(v, 3);
}

// ---- Hough lines -------------------------------------------------------------------

void drawLine(TestImage<Zel8u>& im, int x0, int y0, int x1, int y1) {
  const int steps = std::max(std::abs(x1 - x0), std::abs(y1 - y0));
  for (int i = 0; i <= steps; ++i) {
    const int x = x0 + int(std::lround(double(x1 - x0) * i / std::max(steps, 1)));
    const int y = y0 + int(std::lround(double(y1 - y0) * i / std::max(steps, 1)));
    if (x >= 0 && y >= 0 && x < im.width() && y < im.height()) im.at(x, y) = 255;
  }
}

TEST(FeaturesHough, MatchesReference) {
  std::mt19937 rng(61);
  for (int round = 0; round < 60; ++round) {
    Layout layout = zeltest::randomLayout(rng, 80, 60, 1, 1, 1);
    TestImage<Zel8u> src(layout);
    for (int y = 0; y < layout.height; ++y)
      for (int x = 0; x < layout.width; ++x) src.at(x, y) = rng() % 23 == 0 ? Zel8u(1 + rng() % 255) : 0;
    for (int l = 0; l < 3; ++l)
      drawLine(src, int(rng() % 80), int(rng() % 60), int(rng() % 80), int(rng() % 60));
    const ZeliPoint_32f delta = {0.5f + float(rng() % 4) * 0.5f, float(3.14159265 / (30 + rng() % 150))};
    const int threshold = int(rng() % 12);
    const bool region = round % 2;
    const ZeliPoint_32f range[2] = {{-20.0f + float(rng() % 10), 40.0f + float(rng() % 40)},
                                    {0.1f * float(rng() % 5), 1.5f + 0.3f * float(rng() % 6)}};
    int bytes = 0;
    ASSERT_EQ(zeliHoughLineGetSize_8u_C1R(src.size(), delta, &bytes), zelStatusOk);
    Guarded buffer(bytes, int(rng() % 16));
    const auto expected = region ? featref::hough(plainOf(src), delta.x, delta.y, threshold, range[1].x,
                                                  double(range[1].y) - double(range[1].x), range[0].x, range[0].y)
                                 : featref::hough(plainOf(src), delta.x, delta.y, threshold, 0.0f,
                                                  3.14159265358979323846, -INFINITY, INFINITY);
    const int capacity = round % 3 == 0 ? int(expected.size() / 2) : int(expected.size()) + 2;
    std::vector<ZeliPoint_32f> lines(size_t(capacity) + 1, ZeliPoint_32f{-9.0f, -9.0f});
    int count = -1;
    const ZelStatus s =
        region ? zeliHoughLine_Region_8u32f_C1R(src.data(), src.step(), src.size(), delta, threshold, range,
                                                lines.data(), capacity, &count, buffer.data())
               : zeliHoughLine_8u32f_C1R(src.data(), src.step(), src.size(), delta, threshold, lines.data(), capacity,
                                         &count, buffer.data());
    ASSERT_EQ(s, int(expected.size()) > capacity ? zelStatusOutputFull : zelStatusOk) << round;
    ASSERT_EQ(count, std::min(capacity, int(expected.size())));
    ASSERT_TRUE(buffer.intact());
    for (int i = 0; i < count; ++i) {
      ASSERT_EQ(lines[i].x, expected[i].rho) << round << " line " << i;
      ASSERT_EQ(lines[i].y, expected[i].theta) << round << " line " << i;
    }
    ASSERT_EQ(lines[size_t(count)].x, -9.0f);
  }
}

TEST(FeaturesHough, Checks) {
  std::vector<Zel8u> img(16 * 16, 0), buffer(1 << 20);
  std::vector<ZeliPoint_32f> lines(4);
  int count = -1, bytes = 0;
  EXPECT_EQ(zeliHoughLineGetSize_8u_C1R({16, 16}, {0.0f, 0.1f}, &bytes), zelStatusBadArgument);
  EXPECT_EQ(zeliHoughLineGetSize_8u_C1R({16, 16}, {1.0f, NAN}, &bytes), zelStatusBadArgument);
  EXPECT_EQ(zeliHoughLine_8u32f_C1R(img.data(), 16, {16, 16}, {1.0f, 0.1f}, -1, lines.data(), 4, &count,
                                    buffer.data()),
            zelStatusBadArgument);
  const ZeliPoint_32f empty[2] = {{0.0f, 10.0f}, {1.0f, 1.0f}};
  const ZeliPoint_32f beyond[2] = {{0.0f, 10.0f}, {0.0f, 3.5f}};
  EXPECT_EQ(zeliHoughLine_Region_8u32f_C1R(img.data(), 16, {16, 16}, {1.0f, 0.1f}, 1, empty, lines.data(), 4, &count,
                                           buffer.data()),
            zelStatusBadRange);
  EXPECT_EQ(zeliHoughLine_Region_8u32f_C1R(img.data(), 16, {16, 16}, {1.0f, 0.1f}, 1, beyond, lines.data(), 4, &count,
                                           buffer.data()),
            zelStatusBadRange);
  EXPECT_EQ(count, -1);
}

// ---- probabilistic Hough ------------------------------------------------------------

struct Segment {
  int x0, y0, x1, y1;
};

std::vector<Segment> probLines(const TestImage<Zel8u>& src, unsigned seed, int threshold, int length, int gap,
                               int capacity, ZelStatus* status) {
  const ZeliPoint_32f delta = {1.0f, float(3.14159265358979323846 / 180)};
  int bytes = 0;
  EXPECT_EQ(zeliHoughProbLineGetSize_8u_C1R(src.size(), delta, &bytes), zelStatusOk);
  Guarded state(bytes, int(seed % 16));
  auto* st = reinterpret_cast<ZeliHoughProbState*>(state.data());
  EXPECT_EQ(zeliHoughProbLineInit_8u32f_C1R(src.size(), delta, seed, st), zelStatusOk);
  std::vector<ZeliPoint> points(2 * size_t(capacity) + 2, ZeliPoint{-5, -5});
  int count = -1;
  *status = zeliHoughProbLine_8u32f_C1R(src.data(), src.step(), src.size(), threshold, length, gap, points.data(),
                                        capacity, &count, st);
  EXPECT_TRUE(state.intact());
  EXPECT_EQ(points[2 * size_t(std::max(count, 0))].x, -5);
  std::vector<Segment> out;
  for (int i = 0; i < count; ++i)
    out.push_back({points[2 * i].x, points[2 * i].y, points[2 * i + 1].x, points[2 * i + 1].y});
  return out;
}

TEST(FeaturesHoughProb, FindsSegmentsReproducibly) {
  std::mt19937 rng(71);
  for (int round = 0; round < 20; ++round) {
    Layout layout = zeltest::randomLayout(rng, 120, 90, 1, 1, 1);
    layout.width = std::max(layout.width, 60);
    layout.height = std::max(layout.height, 50);
    TestImage<Zel8u> src(layout);
    for (int y = 0; y < layout.height; ++y)
      for (int x = 0; x < layout.width; ++x) src.at(x, y) = rng() % 97 == 0 ? 255 : 0;
    // One horizontal, one vertical and one diagonal segment.
    const int y0 = 5 + int(rng() % (layout.height - 10)), x0 = 5 + int(rng() % (layout.width - 10));
    drawLine(src, 2, y0, layout.width - 3, y0);
    drawLine(src, x0, 2, x0, layout.height - 3);
    drawLine(src, 3, 3, 3 + 40, 3 + 40);
    const std::vector<uint8_t> before(src.data(), src.data() + size_t(src.step()) * (layout.height - 1) + layout.width);
    ZelStatus status;
    const unsigned seed = unsigned(rng());
    const auto segments = probLines(src, seed, 20, 30, 3, 50, &status);
    ASSERT_EQ(status, zelStatusOk);
    EXPECT_TRUE(std::equal(before.begin(), before.end(), src.data()));  // the source is kept
    auto found = [&](int ax, int ay, int bx, int by) {
      for (const Segment& s : segments)
        for (int flip = 0; flip < 2; ++flip) {
          const int sx0 = flip ? s.x1 : s.x0, sy0 = flip ? s.y1 : s.y0, sx1 = flip ? s.x0 : s.x1,
                    sy1 = flip ? s.y0 : s.y1;
          if (std::abs(sx0 - ax) <= 3 && std::abs(sy0 - ay) <= 3 && std::abs(sx1 - bx) <= 3 && std::abs(sy1 - by) <= 3)
            return true;
        }
      return false;
    };
    EXPECT_TRUE(found(2, y0, layout.width - 3, y0)) << round;
    EXPECT_TRUE(found(x0, 2, x0, layout.height - 3)) << round;
    EXPECT_TRUE(found(3, 3, 43, 43)) << round;
    // Every segment is long enough, and ends on set pixels.
    for (const Segment& s : segments) {
      EXPECT_TRUE(std::abs(s.x1 - s.x0) >= 30 || std::abs(s.y1 - s.y0) >= 30);
      EXPECT_NE(src.at(s.x0, s.y0), 0);
      EXPECT_NE(src.at(s.x1, s.y1), 0);
    }
    // The same seed gives the same segments; a capacity of one stops early.
    ZelStatus again;
    const auto repeat = probLines(src, seed, 20, 30, 3, 50, &again);
    ASSERT_EQ(repeat.size(), segments.size());
    for (size_t i = 0; i < segments.size(); ++i)
      EXPECT_TRUE(std::memcmp(&repeat[i], &segments[i], sizeof(Segment)) == 0);
    const auto one = probLines(src, seed, 20, 30, 3, 1, &again);
    ASSERT_EQ(one.size(), 1u);
    EXPECT_EQ(again, zelStatusOutputFull);
    EXPECT_TRUE(std::memcmp(&one[0], &segments[0], sizeof(Segment)) == 0);
  }
}

TEST(FeaturesHoughProb, MatchesReference) {
  std::mt19937 rng(73);
  for (int round = 0; round < 40; ++round) {
    Layout layout = zeltest::randomLayout(rng, 150, 90, 1, 1, 1);
    TestImage<Zel8u> src(layout);
    const int density = 5 + int(rng() % 60);
    for (int y = 0; y < layout.height; ++y)
      for (int x = 0; x < layout.width; ++x) src.at(x, y) = rng() % density == 0 ? Zel8u(1 + rng() % 255) : 0;
    for (int k = int(rng() % 6); k > 0; --k)
      drawLine(src, int(rng() % layout.width), int(rng() % layout.height), int(rng() % layout.width),
               int(rng() % layout.height));
    const unsigned seed = unsigned(rng());
    const int threshold = 1 + int(rng() % 25), length = int(rng() % 30), gap = int(rng() % 5);
    const int capacity = round % 5 == 0 ? 1 + int(rng() % 3) : 400;
    ZelStatus status;
    const auto got = probLines(src, seed, threshold, length, gap, capacity, &status);
    const auto want = featref::houghProb(plainOf(src), 1.0f, float(3.14159265358979323846 / 180), seed, threshold,
                                         length, gap, capacity);
    ASSERT_EQ(got.size(), want.size()) << "round " << round;
    for (size_t i = 0; i < got.size(); ++i)
      ASSERT_TRUE(got[i].x0 == want[i].x0 && got[i].y0 == want[i].y0 && got[i].x1 == want[i].x1 &&
                  got[i].y1 == want[i].y1)
          << "round " << round << " segment " << i;
  }
}

TEST(FeaturesHoughProb, Checks) {
  const ZeliPoint_32f delta = {1.0f, 0.1f};
  int bytes = 0;
  ASSERT_EQ(zeliHoughProbLineGetSize_8u_C1R({20, 10}, delta, &bytes), zelStatusOk);
  std::vector<Zel8u> state(size_t(bytes), 0), img(64 * 64, 255);
  auto* st = reinterpret_cast<ZeliHoughProbState*>(state.data());
  std::vector<ZeliPoint> seg(8);
  int count = -1;
  EXPECT_EQ(zeliHoughProbLine_8u32f_C1R(img.data(), 64, {20, 10}, 5, 5, 1, seg.data(), 4, &count, st),
            zelStatusBadContext);
  ASSERT_EQ(zeliHoughProbLineInit_8u32f_C1R({20, 10}, delta, 3u, st), zelStatusOk);
  EXPECT_EQ(zeliHoughProbLine_8u32f_C1R(img.data(), 64, {21, 10}, 5, 5, 1, seg.data(), 4, &count, st),
            zelStatusBadSize);
  EXPECT_EQ(zeliHoughProbLine_8u32f_C1R(img.data(), 64, {20, 11}, 5, 5, 1, seg.data(), 4, &count, st),
            zelStatusBadSize);
  EXPECT_EQ(zeliHoughProbLine_8u32f_C1R(img.data(), 64, {20, 10}, 0, 5, 1, seg.data(), 4, &count, st),
            zelStatusBadArgument);
  EXPECT_EQ(count, -1);
  EXPECT_EQ(zeliHoughProbLineInit_8u32f_C1R({20, 10}, {1.0f, -0.1f}, 3u, st), zelStatusBadArgument);
  EXPECT_EQ(zeliHoughProbLineInit_8u32f_C1R({32768, 1}, delta, 3u, st), zelStatusBadSize);
  EXPECT_EQ(zeliHoughProbLineGetSize_8u_C1R({1, 32768}, delta, &bytes), zelStatusBadSize);
}

// ---- line suppression -------------------------------------------------------------

TEST(FeaturesLineSuppression, MatchesReference) {
  std::mt19937 rng(81);
  int kept = 0, dropped = 0;
  for (int round = 0; round < 120; ++round) {
    Layout layout = zeltest::randomLayout(rng, 50, 30, 1, 1, 1);
    TestImage<Zel8u> src(layout);
    if (round % 2) fillScene(src, rng, 10);
    else src.fillRandom(rng, 0, 255);
    Layout fl = layout;
    fl.offsetBytes = int(rng() % 16);
    fl.padBytes = int(rng() % 7);
    TestImage<Zel8u> feature(fl), dst(fl);
    feature.fillRandom(rng, 0, 3);
    const int window = 3 + 2 * int(rng() % 5);
    const float ratio = 1.5f + float(rng() % 20);
    int bytes = 0;
    ASSERT_EQ(zeliLineSuppressionGetBufferSize(src.size(), window, &bytes), zelStatusOk);
    Guarded buffer(bytes, int(rng() % 16));
    ASSERT_EQ(zeliLineSuppression_8u_C1R(src.data(), src.step(), feature.data(), feature.step(), dst.data(),
                                         dst.step(), src.size(), window, ratio, buffer.data()),
              zelStatusOk);
    ASSERT_TRUE(buffer.intact() && dst.sentinelIntact());
    const auto want = featref::suppressLines(plainOf(src), plainOf(feature), window, ratio);
    for (int y = 0; y < layout.height; ++y)
      for (int x = 0; x < layout.width; ++x) {
        ASSERT_EQ(dst.at(x, y), want.at(x, y)) << round << " x=" << x << " y=" << y;
        if (feature.at(x, y)) (dst.at(x, y) ? kept : dropped)++;
      }
  }
  EXPECT_GT(kept, 100);
  EXPECT_GT(dropped, 100);
  std::vector<Zel8u> img(64, 1), buffer(1 << 16);
  EXPECT_EQ(zeliLineSuppression_8u_C1R(img.data(), 8, img.data(), 8, img.data(), 8, {8, 8}, 4, 2.0f, buffer.data()),
            zelStatusBadMaskSize);
  EXPECT_EQ(zeliLineSuppression_8u_C1R(img.data(), 8, img.data(), 8, img.data(), 8, {8, 8}, 3, 1.0f, buffer.data()),
            zelStatusBadArgument);
}

}  // namespace
