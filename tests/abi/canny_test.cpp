// The Canny detector through its exports, pixel for pixel against the plain
// reference: derivative fields and 8-bit images (random, steps, ramps,
// circles, noise), every kernel, norm and border, buffers of exactly the
// reported size, the edge-case fields, the 32-bit stack sizes and the checks.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <random>
#include <vector>

#include "support/canny_reference.h"
#include "support/fault_injection.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::TestImage;

// A work buffer of exactly `bytes` at a chosen distance from a 64-byte
// boundary, with guard bytes on both sides.
class GuardedBuffer {
 public:
  GuardedBuffer(int bytes, int offset) : bytes_(bytes), block_(size_t(bytes) + 256, zeltest::kSentinel) {
    uintptr_t base = (reinterpret_cast<uintptr_t>(block_.data()) + 64 + 63) & ~uintptr_t(63);
    data_ = reinterpret_cast<Zel8u*>(base) + offset;
  }
  Zel8u* data() { return data_; }
  bool guardsIntact() const {
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

int derivativeBufferSize(ZeliSize roi) {
  int bytes = -1;
  EXPECT_EQ(zeliCannyGetSize(roi, &bytes), zelStatusOk);
  return bytes;
}

int borderBufferSize(ZeliSize roi, int filter, int mask, int norm) {
  int bytes = -1;
  EXPECT_EQ(zeliCannyBorderGetSize(roi, filter, mask, norm, &bytes), zelStatusOk);
  return bytes;
}

template <typename T>
TestImage<T> imageFrom(const std::vector<T>& values, int width, int height, std::mt19937& rng) {
  Layout layout = zeltest::randomLayout(rng, 1, 1, 1, sizeof(T), sizeof(T));
  layout.width = width;
  layout.height = height;
  TestImage<T> image(layout);
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x) image.at(x, y) = values[size_t(y) * width + x];
  return image;
}

void expectSameEdges(const TestImage<Zel8u>& dst, const std::vector<Zel8u>& expected) {
  ASSERT_TRUE(dst.sentinelIntact());
  for (int y = 0; y < dst.height(); ++y)
    for (int x = 0; x < dst.width(); ++x)
      ASSERT_EQ(int(dst.at(x, y)), int(expected[size_t(y) * dst.width() + x])) << "x=" << x << " y=" << y;
}

// Runs zeliCanny_16s8u_C1R or zeliCanny_32f8u_C1R and returns the edge image.
ZelStatus callCanny(const TestImage<Zel16s>& dx, const TestImage<Zel16s>& dy, TestImage<Zel8u>& dst, ZeliSize roi,
                    float low, float high, Zel8u* buffer) {
  return zeliCanny_16s8u_C1R(dx.data(), dx.step(), dy.data(), dy.step(), dst.data(), dst.step(), roi, low, high,
                             buffer);
}
ZelStatus callCanny(const TestImage<Zel32f>& dx, const TestImage<Zel32f>& dy, TestImage<Zel8u>& dst, ZeliSize roi,
                    float low, float high, Zel8u* buffer) {
  return zeliCanny_32f8u_C1R(dx.data(), dx.step(), dy.data(), dy.step(), dst.data(), dst.step(), roi, low, high,
                             buffer);
}

template <typename T>
void checkDerivativeCanny(const std::vector<T>& dx, const std::vector<T>& dy, int width, int height, float low,
                          float high, std::mt19937& rng) {
  SCOPED_TRACE(testing::Message() << width << "x" << height << " low " << low << " high " << high);
  TestImage<T> a = imageFrom(dx, width, height, rng), b = imageFrom(dy, width, height, rng);
  Layout dl = zeltest::randomLayout(rng, 1, 1, 1, 1);
  dl.width = width;
  dl.height = height;
  TestImage<Zel8u> dst(dl);
  dst.fillRandom(rng, 0, 255);  // every pixel must be written
  const ZeliSize roi{width, height};
  GuardedBuffer buffer(derivativeBufferSize(roi), std::uniform_int_distribution<int>(0, 31)(rng));
  ASSERT_EQ(callCanny(a, b, dst, roi, low, high, buffer.data()), zelStatusOk);
  EXPECT_TRUE(buffer.guardsIntact());
  EXPECT_TRUE(a.sentinelIntact() && b.sentinelIntact());
  expectSameEdges(dst, zeltest::referenceCanny(dx, dy, width, height, low, high, {true, false}));
}

// ---- Fields and images -------------------------------------------------------

// 8-bit test pictures: 0 noise, 1 vertical step, 2 horizontal step,
// 3 diagonal step, 4 ramp, 5 circles, 6 constant, 7 circles plus noise.
std::vector<Zel8u> picture(int kind, int width, int height, std::mt19937& rng) {
  std::vector<Zel8u> p(size_t(width) * height);
  std::uniform_int_distribution<int> noise(-12, 12);
  const int cx = width / 2, cy = height / 2, radius = std::max(1, std::min(width, height) / 3);
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x) {
      int v = 0;
      switch (kind) {
        case 0: v = int(rng() % 256); break;
        case 1: v = x < cx ? 40 : 200; break;
        case 2: v = y < cy ? 230 : 20; break;
        case 3: v = x + y < cx + cy ? 60 : 180; break;
        case 4: v = (3 * x + 2 * y) % 256; break;
        case 6: v = 77; break;
        default: {
          const int d2 = (x - cx) * (x - cx) + (y - cy) * (y - cy);
          v = d2 < radius * radius ? 190 : d2 < 4 * radius * radius ? 110 : 30;
          if (kind == 7) v += noise(rng);
        }
      }
      p[size_t(y) * width + x] = Zel8u(std::min(255, std::max(0, v)));
    }
  return p;
}

// Thresholds drawn from the magnitudes present, so that ties with low and high
// occur; sometimes equal, sometimes zero.
template <typename T>
std::pair<float, float> drawThresholds(const std::vector<T>& dx, const std::vector<T>& dy, bool l2,
                                       std::mt19937& rng) {
  auto magnitude = [&](size_t i) {
    const double a = double(dx[i]), b = double(dy[i]);
    if (l2) return float(std::sqrt(a * a + b * b));
    return std::is_floating_point<T>::value ? std::fabs(float(dx[i])) + std::fabs(float(dy[i]))
                                            : float(std::fabs(a) + std::fabs(b));
  };
  std::uniform_int_distribution<size_t> pick(0, dx.size() - 1);
  float low = magnitude(pick(rng)), high = magnitude(pick(rng));
  if (low > high) std::swap(low, high);
  switch (rng() % 6) {
    case 0: high = low; break;
    case 1: low = 0.0f; break;
    default: break;
  }
  return {low, high};
}

template <typename T>
void derivativeField(int kind, int width, int height, std::mt19937& rng, std::vector<T>& dx, std::vector<T>& dy) {
  const size_t n = size_t(width) * height;
  dx.resize(n);
  dy.resize(n);
  if (kind < 8) {  // derivatives of a picture
    std::vector<Zel16s> sx, sy;
    std::vector<Zel8u> p = picture(kind, width, height, rng);
    zeltest::referenceDerivatives(p.data(), width, width, height, int(rng() % 3), 1, 0, sx, sy);
    const T scale = std::is_floating_point<T>::value ? T(0.37) : T(1);
    for (size_t i = 0; i < n; ++i) {
      dx[i] = T(sx[i] * scale);
      dy[i] = T(sy[i] * scale);
    }
    return;
  }
  // Small values: many plateaus, zeros and exact ties between directions.
  const int range = kind == 8 ? 3 : 32767;
  std::uniform_int_distribution<int> v(-range, range);
  for (size_t i = 0; i < n; ++i) {
    dx[i] = T(v(rng));
    dy[i] = T(v(rng));
    if (std::is_floating_point<T>::value && rng() % 7 == 0) dy[i] = T(-0.0);
  }
  if (kind == 10 && !std::is_floating_point<T>::value)  // the extreme 16-bit values
    for (size_t i = 0; i < n; i += 3) dx[i] = -32768;
}

template <typename T>
void derivativeSweep(uint32_t seed) {
  std::mt19937 rng(seed);
  for (int trial = 0; trial < 60; ++trial) {
    int width = std::uniform_int_distribution<int>(1, trial < 40 ? 40 : 200)(rng);
    int height = std::uniform_int_distribution<int>(1, trial < 40 ? 30 : 150)(rng);
    if (trial == 0) width = height = 1;
    const int kind = trial % 11;
    SCOPED_TRACE(testing::Message() << "field " << kind);
    std::vector<T> dx, dy;
    derivativeField(kind, width, height, rng, dx, dy);
    auto [low, high] = drawThresholds(dx, dy, false, rng);
    checkDerivativeCanny(dx, dy, width, height, low, high, rng);
  }
}

TEST(CannyDerivatives, Match16sReferenceOnFieldsAndPictures) { derivativeSweep<Zel16s>(3); }
TEST(CannyDerivatives, Match32fReferenceOnFieldsAndPictures) { derivativeSweep<Zel32f>(4); }

// ---- The image entry ---------------------------------------------------------

struct BorderCase {
  int filter, mask, norm, border;
};

void checkBorderCanny(const BorderCase& c, int kind, int width, int height, std::mt19937& rng) {
  constexpr int kMargin = 2;  // real pixels around the region for in-memory sides
  Layout layout = zeltest::randomLayout(rng, 1, 1, 1, 1);
  layout.width = width + 2 * kMargin;
  layout.height = height + 2 * kMargin;
  TestImage<Zel8u> src(layout);
  const std::vector<Zel8u> p = picture(kind, layout.width, layout.height, rng);
  for (int y = 0; y < layout.height; ++y)
    for (int x = 0; x < layout.width; ++x) src.at(x, y) = p[size_t(y) * layout.width + x];
  const Zel8u* roiStart = &src.at(kMargin, kMargin);
  const Zel8u value = Zel8u(rng());
  const int kernel = c.mask == zelMaskSize5x5 ? 2 : c.filter == zelFilterScharr ? 1 : 0;

  std::vector<Zel16s> dx, dy;
  zeltest::referenceDerivatives(roiStart, src.step(), width, height, kernel, c.border, value, dx, dy);
  auto [low, high] = drawThresholds(dx, dy, c.norm == zelNormL2, rng);
  SCOPED_TRACE(testing::Message() << "filter " << c.filter << " mask " << c.mask << " norm " << c.norm
                                  << " border " << c.border << " picture " << kind << " " << width << "x"
                                  << height << " low " << low << " high " << high);

  Layout dl = zeltest::randomLayout(rng, 1, 1, 1, 1);
  dl.width = width;
  dl.height = height;
  TestImage<Zel8u> dst(dl);
  dst.fillRandom(rng, 0, 255);
  const ZeliSize roi{width, height};
  GuardedBuffer buffer(borderBufferSize(roi, c.filter, c.mask, c.norm),
                       std::uniform_int_distribution<int>(0, 31)(rng));
  ASSERT_EQ(zeliCannyBorder_8u_C1R(roiStart, src.step(), dst.data(), dst.step(), roi, c.filter, c.mask, c.border,
                                   value, low, high, c.norm, buffer.data()),
            zelStatusOk);
  EXPECT_TRUE(buffer.guardsIntact());
  EXPECT_TRUE(src.sentinelIntact());
  expectSameEdges(dst, zeltest::referenceCanny(dx, dy, width, height, low, high, {false, c.norm == zelNormL2}));
}

TEST(CannyBorder, MatchesReferenceForEveryKernelNormAndBorder) {
  std::mt19937 rng(5);
  const int kernels[][2] = {{zelFilterSobel, zelMaskSize3x3}, {zelFilterScharr, zelMaskSize3x3},
                            {zelFilterSobel, zelMaskSize5x5}};
  const int borders[] = {zelBorderConstant, zelBorderReplicate, zelBorderInMemory, zelBorderInMemTop | 1,
                         zelBorderInMemLeft | zelBorderInMemBottom, 0xF0 | 1, zelBorderInMemRight | 6};
  for (const auto& k : kernels)
    for (int norm : {zelNormL1, zelNormL2})
      for (int border : borders)
        for (int trial = 0; trial < 4; ++trial) {
          const int width = std::uniform_int_distribution<int>(1, trial == 3 ? 200 : 24)(rng);
          const int height = std::uniform_int_distribution<int>(1, trial == 3 ? 150 : 20)(rng);
          checkBorderCanny({k[0], k[1], norm, border}, int(rng() % 8), width, height, rng);
        }
}

TEST(CannyBorder, AllocatesNothing) {
  zeltest::FaultInjection faults;
  std::mt19937 rng(6);
  checkBorderCanny({zelFilterSobel, zelMaskSize3x3, zelNormL2, zelBorderReplicate}, 7, 64, 48, rng);
  EXPECT_EQ(faults.allocations(), 0);
}

// ---- Edge-case fields ----------------------------------------------------------

// Edges of a 16-bit derivative field, checked against the reference as well.
std::vector<Zel8u> edges16s(const std::vector<Zel16s>& dx, const std::vector<Zel16s>& dy, int width, int height,
                            float low, float high) {
  std::mt19937 rng(width * 131 + height);
  checkDerivativeCanny(dx, dy, width, height, low, high, rng);
  std::vector<Zel32f> fx(dx.begin(), dx.end()), fy(dy.begin(), dy.end());
  checkDerivativeCanny(fx, fy, width, height, low, high, rng);
  return zeltest::referenceCanny(dx, dy, width, height, low, high, {true, false});
}

std::vector<Zel8u> only(int width, int height, std::initializer_list<std::pair<int, int>> points) {
  std::vector<Zel8u> e(size_t(width) * height, 0);
  for (auto [x, y] : points) e[size_t(y) * width + x] = 255;
  return e;
}

TEST(CannyFields, ConstantFieldsEdgeOnlyWhereTheComparedNeighbourIsOutside) {
  const int w = 7, h = 5;
  const size_t n = size_t(w) * h;
  std::vector<Zel16s> c(n, 50), z(n, 0), minus(n, -50);
  std::vector<std::pair<int, int>> column, row;
  for (int y = 0; y < h; ++y) column.emplace_back(0, y);
  for (int x = 0; x < w; ++x) row.emplace_back(x, 0);
  std::vector<Zel8u> firstColumn(n, 0), firstRow(n, 0);
  for (auto [x, y] : column) firstColumn[size_t(y) * w + x] = 255;
  for (auto [x, y] : row) firstRow[size_t(y) * w + x] = 255;
  EXPECT_EQ(edges16s(c, z, w, h, 10, 40), firstColumn);
  EXPECT_EQ(edges16s(c, z, w, h, 10, 50), std::vector<Zel8u>(n, 0));  // m == high does not seed
  EXPECT_EQ(edges16s(z, c, w, h, 10, 40), firstRow);
  // Diagonals: only the two corners whose compared neighbours both lie outside.
  EXPECT_EQ(edges16s(c, c, w, h, 10, 40), only(w, h, {{w - 1, 0}, {0, h - 1}}));
  EXPECT_EQ(edges16s(c, minus, w, h, 10, 40), only(w, h, {{0, 0}, {w - 1, h - 1}}));
  EXPECT_EQ(edges16s({50}, {50}, 1, 1, 10, 40), only(1, 1, {{0, 0}}));
  // Zero magnitudes never become edges, even with zero thresholds.
  EXPECT_EQ(edges16s(z, z, w, h, 0, 0), std::vector<Zel8u>(n, 0));
}

TEST(CannyFields, RidgesPlateausEqualThresholdsAndDiagonalChains) {
  const int w = 9, h = 6;
  const size_t n = size_t(w) * h;
  std::vector<Zel16s> dx(n, 0), z(n, 0);
  for (int y = 0; y < h; ++y) dx[size_t(y) * w + 3] = 100;
  std::vector<Zel8u> ridge(n, 0);
  for (int y = 0; y < h; ++y) ridge[size_t(y) * w + 3] = 255;
  EXPECT_EQ(edges16s(dx, z, w, h, 20, 60), ridge);
  // Equal thresholds: candidates at m == high join only through a seed.
  EXPECT_EQ(edges16s(dx, z, w, h, 100, 100), std::vector<Zel8u>(n, 0));
  dx[size_t(2) * w + 3] = 120;
  EXPECT_EQ(edges16s(dx, z, w, h, 100, 100), ridge);
  // A plateau two pixels wide across the edge keeps its left pixel.
  for (int y = 0; y < h; ++y) dx[size_t(y) * w + 3] = dx[size_t(y) * w + 4] = 100;
  EXPECT_EQ(edges16s(dx, z, w, h, 20, 60), ridge);
  std::vector<Zel8u> topRow(n, 0);
  for (int x = 0; x < w; ++x) topRow[size_t(2) * w + x] = 255;
  std::vector<Zel16s> dy(n, 0);
  for (int x = 0; x < w; ++x) dy[size_t(2) * w + x] = dy[size_t(3) * w + x] = 100;
  EXPECT_EQ(edges16s(z, dy, w, h, 20, 60), topRow);
  // Weak maxima touching only diagonally are connected to the seed.
  std::vector<Zel16s> chain(n, 0);
  for (int i = 0; i < 5; ++i) chain[size_t(i) * w + i + 1] = i == 0 ? 120 : 70;
  EXPECT_EQ(edges16s(chain, z, w, h, 50, 100), only(w, h, {{1, 0}, {2, 1}, {3, 2}, {4, 3}, {5, 4}}));
  chain[size_t(2) * w + 3] = 0;  // a gap stops the growth
  EXPECT_EQ(edges16s(chain, z, w, h, 50, 100), only(w, h, {{1, 0}, {2, 1}}));
}

// ---- Sizes that need 32-bit stack coordinates ----------------------------------

TEST(CannySizes, SidesOf65533AndAboveMatchTheReference) {
  std::mt19937 rng(9);
  for (ZeliSize roi : {ZeliSize{1, 70000}, ZeliSize{65533, 2}}) {
    SCOPED_TRACE(testing::Message() << roi.width << "x" << roi.height);
    std::vector<Zel16s> dx, dy;
    derivativeField(7, roi.width, roi.height, rng, dx, dy);
    checkDerivativeCanny(dx, dy, roi.width, roi.height, 20.0f, 90.0f, rng);
    checkBorderCanny({zelFilterSobel, zelMaskSize3x3, zelNormL1, zelBorderReplicate}, 7, roi.width, roi.height,
                     rng);
  }
  std::vector<Zel32f> fx, fy;
  derivativeField(9, 2, 66000, rng, fx, fy);
  checkDerivativeCanny(fx, fy, 2, 66000, 1000.0f, 20000.0f, rng);
}

}  // namespace
