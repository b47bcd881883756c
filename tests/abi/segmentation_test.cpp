// Labelling, speckles, watershed, gradient segmentation and boundaries against
// the references of segmentation_reference.h, over random sizes, steps,
// start offsets, value counts and parameters; plus the argument checks with
// their codes and order.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>

#include "abi/integral_reference.h"
#include "abi/segmentation_reference.h"
#include "zelcv.h"

namespace {

using zeltest::exactLayout;
using zeltest::Grid;
using zeltest::TestImage;

// A random exact layout of `channels` interleaved elements per pixel.
zeltest::Layout layoutOf(std::mt19937& rng, int w, int h, int elementBytes, int channels) {
  zeltest::Layout l = exactLayout(rng, w, h, elementBytes, rng() % 3 == 0);
  l.channels = channels;
  return l;
}

template <typename T>
TestImage<T> toImage(std::mt19937& rng, const Grid& g, int channels = 1) {
  TestImage<T> img(layoutOf(rng, g.w, g.h, int(sizeof(T)), channels));
  for (int y = 0; y < g.h; ++y)
    for (int x = 0; x < g.w; ++x)
      for (int c = 0; c < channels; ++c) img.at(x, y, c) = T(g.at(x, y));
  return img;
}

template <typename T>
::testing::AssertionResult matches(const TestImage<T>& img, const Grid& want) {
  if (!img.sentinelIntact()) return ::testing::AssertionFailure() << "wrote outside the image";
  for (int y = 0; y < want.h; ++y)
    for (int x = 0; x < want.w; ++x)
      if (int64_t(img.at(x, y)) != want.at(x, y))
        return ::testing::AssertionFailure() << "at (" << x << ", " << y << ") of " << want.w << " x " << want.h
                                             << ": got " << int64_t(img.at(x, y)) << ", want " << want.at(x, y);
  return ::testing::AssertionSuccess();
}

std::vector<uint8_t> buffer(int bytes) { return std::vector<uint8_t>(size_t(bytes) + 1, 0xCD); }

// Sizes 1 x 1 up to 70 x 40, thin and wide ones included.
std::pair<int, int> randomSize(std::mt19937& rng, int i) {
  static const int fixed[][2] = {{1, 1}, {1, 17}, {33, 1}, {2, 2}, {16, 3}, {17, 5}, {64, 2}};
  if (i < 7) return {fixed[i][0], fixed[i][1]};
  return {1 + int(rng() % 70), 1 + int(rng() % 40)};
}

TEST(LabelMarkers, EveryFormMatchesThePixelUnionFind) {
  std::mt19937 rng(2401);
  for (int i = 0; i < 160; ++i) {
    const std::pair<int, int> size = randomSize(rng, i);
    const int w = size.first, h = size.second;
    const int values = 1 + int(rng() % 4);
    const Grid g = zeltest::blobGrid(rng, w, h, values);
    const int norm = rng() % 2 ? zelNormInf : zelNormL1;
    // Small ranges make later regions share maxLabel.
    const int minLabel = 1 + int(rng() % 5), span = rng() % 3 ? 249 : int(rng() % 6);
    SCOPED_TRACE(testing::Message() << w << " x " << h << " values " << values << " norm " << norm << " labels "
                                    << minLabel << ".." << minLabel + span);
    const auto [want, count] = zeltest::labelReference(g, norm == zelNormInf, minLabel, minLabel + span);
    const ZeliSize roi = {w, h};
    int bytes = 0;
    ASSERT_EQ(zeliLabelMarkersGetBufferSize_8u_C1R(roi, &bytes), 0);
    EXPECT_EQ(bytes, 12 * w * h + 4 * (h + 1) + 64);
    std::vector<uint8_t> buf = buffer(bytes);
    int num = -1;

    auto m8 = toImage<Zel8u>(rng, g);
    ASSERT_EQ(zeliLabelMarkers_8u_C1IR(m8.data(), m8.step(), roi, minLabel, minLabel + span, norm, &num,
                                       buf.data() + rng() % 2),
              0);
    EXPECT_EQ(num, count);
    EXPECT_TRUE(matches(m8, want));

    auto m16 = toImage<Zel16u>(rng, g);
    const int big = minLabel + 1000;  // labels above 8 bits
    const auto want16 = zeltest::labelReference(g, norm == zelNormInf, big, big + span).first;
    num = -1;
    ASSERT_EQ(zeliLabelMarkers_16u_C1IR(m16.data(), m16.step(), roi, big, big + span, norm, &num, buf.data()), 0);
    EXPECT_EQ(num, count);
    EXPECT_TRUE(matches(m16, want16));

    auto src = toImage<Zel8u>(rng, g);
    TestImage<Zel32s> m32(exactLayout(rng, w, h, 4, rng() % 2 == 0));
    zeltest::fillGarbage(m32, rng);
    const int huge = 2000000000;
    const auto want32 = zeltest::labelReference(g, norm == zelNormInf, huge, huge + span).first;
    num = -1;
    ASSERT_EQ(zeliLabelMarkers_8u32s_C1R(src.data(), src.step(), m32.data(), m32.step(), roi, huge, huge + span,
                                         norm, &num, buf.data()),
              0);
    EXPECT_EQ(num, count);
    EXPECT_TRUE(matches(m32, want32));
    EXPECT_TRUE(matches(src, g));  // the source is only read
    ASSERT_EQ(buf.back(), 0xCD);
    if (::testing::Test::HasFailure()) return;
  }
}

TEST(LabelMarkers, LabelLimitsAndChecks) {
  std::mt19937 rng(3);
  Grid g = zeltest::blobGrid(rng, 9, 7, 2);
  auto img = toImage<Zel8u>(rng, g);
  const ZeliSize roi = {9, 7};
  std::vector<uint8_t> buf = buffer(2000);
  int num = -7;
  auto untouched = [&] { return matches(img, g); };
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(nullptr, 9, {0, 7}, 1, 2, 1, &num, buf.data()), zelStatusNullPointer);
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(img.data(), img.step(), roi, 1, 2, 1, nullptr, buf.data()), zelStatusNullPointer);
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(img.data(), img.step(), roi, 1, 2, 1, &num, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(img.data(), img.step(), {9, 0}, 1, 2, 3, &num, buf.data()), zelStatusBadSize);
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(img.data(), 8, roi, 1, 2, 3, &num, buf.data()), zelStatusBadStep);
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(img.data(), img.step(), roi, 1, 2, 3, &num, buf.data()), zelStatusBadArgument);
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(img.data(), img.step(), roi, 0, 2, 1, &num, buf.data()), zelStatusBadArgument);
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(img.data(), img.step(), roi, 1, 255, 1, &num, buf.data()), zelStatusBadArgument);
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(img.data(), img.step(), roi, 5, 4, 1, &num, buf.data()), zelStatusBadRange);
  EXPECT_EQ(zeliLabelMarkers_8u_C1IR(img.data(), img.step(), {1 << 20, 1 << 12}, 1, 2, 1, &num, buf.data()),
            zelStatusBadStep);
  EXPECT_TRUE(untouched());
  EXPECT_EQ(num, -7);
  Zel16u m16[4] = {};
  EXPECT_EQ(zeliLabelMarkers_16u_C1IR(m16, 3, {1, 1}, 1, 2, 1, &num, buf.data()), zelStatusMisalignedStep);
  EXPECT_EQ(zeliLabelMarkers_16u_C1IR(m16, 2, {1, 1}, 1, 65535, 1, &num, buf.data()), zelStatusBadArgument);
  EXPECT_EQ(zeliLabelMarkers_16u_C1IR(m16, 2, {1, 1}, 1, 65534, 1, &num, buf.data()), zelStatusOk);
  int bytes = 5;
  EXPECT_EQ(zeliLabelMarkersGetBufferSize_16u_C1R({0, 3}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliLabelMarkersGetBufferSize_16u_C1R({0, 3}, &bytes), zelStatusBadSize);
  EXPECT_EQ(zeliLabelMarkersGetBufferSize_8u32s_C1R({20000, 20000}, &bytes), zelStatusBadSize);
  EXPECT_EQ(bytes, 5);
}

template <typename T>
struct SpeckleCase {
  std::vector<T> (*draw)(std::mt19937&, int, int);
};

template <typename T>
void checkSpeckles(ZelStatus (*fn)(T*, int, ZeliSize, T, int, T, int, Zel8u*), ZelDataType type, uint32_t seed,
                   T lo, T hi, T maxDiffTop) {
  std::mt19937 rng(seed);
  for (int i = 0; i < 120; ++i) {
    const std::pair<int, int> size = randomSize(rng, i);
    const int w = size.first, h = size.second;
    // Few distinct levels plus noise so that joins and breaks both occur.
    std::vector<T> values(size_t(w) * h);
    const int levels = 1 + int(rng() % 4);
    for (auto& v : values) {
      const double base = double(lo) + double(hi - lo) * double(rng() % levels) / double(levels);
      v = T(base + double(rng() % 4));
    }
    const T speckle = rng() % 3 ? values[rng() % values.size()] : T(lo);
    const int maxSize = int(rng() % 40);
    const T maxDiff = T(double(maxDiffTop) * double(rng() % 5) / 4.0);
    SCOPED_TRACE(testing::Message() << w << " x " << h << " speckle " << double(speckle) << " size " << maxSize
                                    << " diff " << double(maxDiff));
    auto near = [&](T a, T b) {
      if constexpr (std::is_floating_point<T>::value)
        return std::fabs(a - b) <= maxDiff;
      else
        return std::abs(int32_t(a) - int32_t(b)) <= int32_t(maxDiff);
    };
    const std::vector<T> want = zeltest::speckleReference(values, w, h, speckle, maxSize, near);
    TestImage<T> img(exactLayout(rng, w, h, int(sizeof(T)), rng() % 2 == 0));
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) img.at(x, y) = values[size_t(y) * w + x];
    int bytes = 0;
    ASSERT_EQ(zeliMarkSpecklesGetBufferSize({w, h}, type, &bytes), 0);
    std::vector<uint8_t> buf = buffer(bytes);
    ASSERT_EQ(fn(img.data(), img.step(), {w, h}, speckle, maxSize, maxDiff, zelNormInf, buf.data() + rng() % 2), 0);
    ASSERT_TRUE(img.sentinelIntact());
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x)
        ASSERT_EQ(double(img.at(x, y)), double(want[size_t(y) * w + x])) << "at " << x << ", " << y;
  }
}

TEST(MarkSpeckles, EveryTypeMatchesTheBreadthFirstSearch) {
  checkSpeckles<Zel8u>(zeliMarkSpeckles_8u_C1IR, zel8u, 11, 0, 250, 4);
  checkSpeckles<Zel16u>(zeliMarkSpeckles_16u_C1IR, zel16u, 12, 0, 60000, 4);
  checkSpeckles<Zel16s>(zeliMarkSpeckles_16s_C1IR, zel16s, 13, -30000, 30000, 4);
  checkSpeckles<Zel32f>(zeliMarkSpeckles_32f_C1IR, zel32f, 14, -3.0f, 500.0f, 3.0f);
}

TEST(MarkSpeckles, Checks) {
  Zel16s img[8] = {1, 1, 5, 1, 1, 1, 1, 1};
  std::vector<uint8_t> buf = buffer(400);
  int bytes = 3;
  EXPECT_EQ(zeliMarkSpecklesGetBufferSize({2, 2}, 4, &bytes), zelStatusBadDataType);
  EXPECT_EQ(zeliMarkSpecklesGetBufferSize({2, 2}, zel16s, nullptr), zelStatusNullPointer);
  EXPECT_EQ(bytes, 3);
  EXPECT_EQ(zeliMarkSpeckles_16s_C1IR(img, 8, {4, 2}, 0, 1, 1, 1, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliMarkSpeckles_16s_C1IR(img, 6, {4, 2}, 0, 1, 1, 1, buf.data()), zelStatusBadStep);
  EXPECT_EQ(zeliMarkSpeckles_16s_C1IR(img, 9, {4, 1}, 0, 1, 1, 1, buf.data()), zelStatusMisalignedStep);
  EXPECT_EQ(zeliMarkSpeckles_16s_C1IR(img, 8, {4, 2}, 0, 1, 1, zelNormL1, buf.data()), zelStatusBadNormType);
  EXPECT_EQ(zeliMarkSpeckles_16s_C1IR(img, 8, {4, 2}, 0, -1, 1, 1, buf.data()), zelStatusBadArgument);
  EXPECT_EQ(zeliMarkSpeckles_16s_C1IR(img, 8, {4, 2}, 0, 1, -1, 1, buf.data()), zelStatusBadArgument);
  Zel32f f[2] = {1, 2};
  EXPECT_EQ(zeliMarkSpeckles_32f_C1IR(f, 8, {2, 1}, 0, 1, NAN, 1, buf.data()), zelStatusBadArgument);
  EXPECT_EQ(img[2], 5);
  // The lone 5 is a speckle of one pixel; the 1s are a region of 7.
  EXPECT_EQ(zeliMarkSpeckles_16s_C1IR(img, 8, {4, 2}, 0, 1, 1, 1, buf.data()), zelStatusOk);
  EXPECT_EQ(img[2], 0);
  EXPECT_EQ(img[0], 1);
}

// Random markers: a few seed labels, barriers and unlabelled pixels.
Grid randomMarkers(std::mt19937& rng, int w, int h, int64_t boundary, int64_t maxLabel) {
  Grid g{w, h, std::vector<int64_t>(size_t(w) * h, 0)};
  const int seeds = 1 + int(rng() % 6);
  for (int s = 0; s < seeds; ++s) g.v[rng() % g.v.size()] = 1 + int64_t(rng() % uint64_t(maxLabel));
  if (rng() % 2)
    for (int s = 0; s < w * h / 15; ++s) g.v[rng() % g.v.size()] = boundary;
  return g;
}

template <typename M>
void checkFlood(bool watershed, int channels, uint32_t seed) {
  std::mt19937 rng(seed);
  const int64_t boundary = int64_t(M(~M(0)));
  for (int i = 0; i < 150; ++i) {
    const std::pair<int, int> size = randomSize(rng, i);
    const int w = size.first, h = size.second;
    // Smooth reliefs with ties and rough ones.
    TestImage<Zel8u> src(layoutOf(rng, w, h, 1, channels));
    const int coarse = 1 + int(rng() % 60);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w * channels; ++x) src.row(y)[x] = Zel8u((rng() % 256) / coarse * coarse);
    const Grid markers = randomMarkers(rng, w, h, boundary, sizeof(M) == 1 ? 254 : 65534);
    const int norm = rng() % 2 ? zelNormInf : zelNormL1;
    const int flag = int(rng() % 2);
    SCOPED_TRACE(testing::Message() << (watershed ? "watershed " : "gradient C") << channels << " " << w << " x "
                                    << h << " norm " << norm << " flag " << flag);
    auto pix = [&](size_t i) { return src.row(int(i / w)) + (i % w) * channels; };
    std::function<int(size_t, size_t)> prio;
    if (watershed)
      prio = [&](size_t q, size_t) { return int(*pix(q)); };
    else
      prio = [&](size_t q, size_t p) {
        int m = 0;
        for (int c = 0; c < channels; ++c) m = std::max(m, std::abs(int(pix(q)[c]) - int(pix(p)[c])));
        return m;
      };
    const Grid want = zeltest::floodReference(markers, norm == zelNormInf, flag == 1, boundary, prio, watershed);
    auto img = toImage<M>(rng, markers);
    int bytes = 0;
    if (watershed)
      ASSERT_EQ((sizeof(M) == 1 ? zeliSegmentWatershedGetBufferSize_8u_C1R
                                : zeliSegmentWatershedGetBufferSize_8u16u_C1R)({w, h}, &bytes),
                0);
    else
      ASSERT_EQ((channels == 1 ? zeliSegmentGradientGetBufferSize_8u_C1R
                               : zeliSegmentGradientGetBufferSize_8u_C3R)({w, h}, &bytes),
                0);
    EXPECT_EQ(bytes, 5 * w * h + 2112);
    std::vector<uint8_t> buf = buffer(bytes);
    Zel8u* b = buf.data() + rng() % 2;
    ZelStatus st;
    if constexpr (sizeof(M) == 2)
      st = zeliSegmentWatershed_8u16u_C1IR(src.data(), src.step(), img.data(), img.step(), {w, h}, norm, flag, b);
    else if (watershed)
      st = zeliSegmentWatershed_8u_C1IR(src.data(), src.step(), img.data(), img.step(), {w, h}, norm, flag, b);
    else
      st = (channels == 1 ? zeliSegmentGradient_8u_C1IR : zeliSegmentGradient_8u_C3IR)(
          src.data(), src.step(), img.data(), img.step(), {w, h}, norm, flag, b);
    ASSERT_EQ(st, 0);
    EXPECT_TRUE(matches(img, want));
    EXPECT_TRUE(src.sentinelIntact());
    ASSERT_EQ(buf.back(), 0xCD);
    if (::testing::Test::HasFailure()) return;
  }
}

TEST(SegmentWatershed, BothMarkerTypesMatchThePriorityQueue) {
  checkFlood<Zel8u>(true, 1, 31);
  checkFlood<Zel16u>(true, 1, 32);
}

TEST(SegmentGradient, BothChannelCountsMatchThePriorityQueue) {
  checkFlood<Zel8u>(false, 1, 41);
  checkFlood<Zel8u>(false, 3, 42);
}

TEST(SegmentWatershed, Checks) {
  Zel8u src[6] = {}, m[6] = {1, 0, 0, 0, 0, 2};
  Zel16u m16[6] = {};
  std::vector<uint8_t> buf = buffer(5 * 6 + 2112);
  EXPECT_EQ(zeliSegmentWatershed_8u_C1IR(src, 3, m, 3, {3, 2}, 1, 0, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliSegmentWatershed_8u_C1IR(src, 3, nullptr, 3, {0, 2}, 1, 0, buf.data()), zelStatusNullPointer);
  EXPECT_EQ(zeliSegmentWatershed_8u_C1IR(src, 3, m, 3, {-1, 2}, 1, 0, buf.data()), zelStatusBadSize);
  EXPECT_EQ(zeliSegmentWatershed_8u_C1IR(src, 2, m, 3, {3, 2}, 1, 0, buf.data()), zelStatusBadStep);
  EXPECT_EQ(zeliSegmentWatershed_8u16u_C1IR(src, 3, m16, 7, {3, 2}, 1, 0, buf.data()), zelStatusMisalignedStep);
  EXPECT_EQ(zeliSegmentWatershed_8u_C1IR(src, 3, m, 3, {3, 2}, 4, 0, buf.data()), zelStatusBadArgument);
  EXPECT_EQ(zeliSegmentGradient_8u_C3IR(src, 3, m, 3, {3, 2}, 1, 0, buf.data()), zelStatusBadStep);
  EXPECT_EQ(zeliSegmentGradient_8u_C1IR(src, 3, m, 3, {3, 2}, 1, 2, buf.data()), zelStatusBadArgument);
  EXPECT_EQ(m[1], 0);
  EXPECT_EQ(zeliSegmentWatershed_8u_C1IR(src, 3, m, 3, {3, 2}, zelNormL1, zelSegmentLines, buf.data()), 0);
  // A flat relief: raster order decides. (1, 0) joins 1 first; (2, 0) then
  // sees 1 and 2, as does (1, 1) after (0, 1) joined 1.
  const Zel8u want[6] = {1, 1, 255, 1, 255, 2};
  EXPECT_EQ(std::memcmp(m, want, 6), 0);
}

template <typename T>
void checkBounds(ZelStatus (*fn)(T*, int, ZeliSize, T, int), uint32_t seed, T val) {
  std::mt19937 rng(seed);
  for (int i = 0; i < 200; ++i) {
    const std::pair<int, int> size = randomSize(rng, i);
    const int w = size.first, h = size.second;
    Grid g = zeltest::blobGrid(rng, w, h, 1 + int(rng() % 3));
    if (sizeof(T) > 1)
      for (auto& v : g.v) v *= 20000;  // values that differ only above the low byte
    const int norm = rng() % 2 ? zelNormInf : zelNormL1;
    SCOPED_TRACE(testing::Message() << w << " x " << h << " norm " << norm);
    const Grid want = zeltest::boundReference(g, norm == zelNormInf, int64_t(val));
    auto img = toImage<T>(rng, g);
    ASSERT_EQ(fn(img.data(), img.step(), {w, h}, val, norm), 0);
    EXPECT_TRUE(matches(img, want));
    if (::testing::Test::HasFailure()) return;
  }
}

TEST(BoundSegments, EveryTypeMatchesTheCopyReference) {
  checkBounds<Zel8u>(zeliBoundSegments_8u_C1IR, 51, 255);
  checkBounds<Zel16u>(zeliBoundSegments_16u_C1IR, 52, 7);
  checkBounds<Zel32s>(zeliBoundSegments_32s_C1IR, 53, -3);
  Zel32s m[2] = {1, 2};
  EXPECT_EQ(zeliBoundSegments_32s_C1IR(nullptr, 8, {2, 1}, 0, 1), zelStatusNullPointer);
  EXPECT_EQ(zeliBoundSegments_32s_C1IR(m, 6, {2, 1}, 0, 1), zelStatusBadStep);
  EXPECT_EQ(zeliBoundSegments_32s_C1IR(m, 10, {2, 1}, 0, 1), zelStatusMisalignedStep);
  EXPECT_EQ(zeliBoundSegments_32s_C1IR(m, 8, {2, 1}, 0, 0), zelStatusBadArgument);
  EXPECT_EQ(m[0], 1);
}

}  // namespace
