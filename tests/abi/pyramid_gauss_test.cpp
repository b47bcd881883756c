// The Gaussian 5x5 pyramid pair against a plain reference over random sizes
// (1x1 upward, odd and even), steps and start offsets, for every type and
// channel count; the edge rules; the argument checks and buffer queries.
#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <type_traits>
#include <vector>

#include "support/test_image.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::TestImage;

// Reflection without repeating the edge, walking back and forth on tiny rows.
int reflect(int i, int n) {
  if (n == 1) return 0;
  while (i < 0 || i >= n) i = i < 0 ? -i : 2 * (n - 1) - i;
  return i;
}

template <typename T>
using Acc = typename std::conditional<std::is_same<T, float>::value, float, int>::type;

template <typename T>
Acc<T> at(const TestImage<T>& im, int x, int y, int c) {
  return Acc<T>(im.at(x, y, c));
}

// Rows first, then columns, with the sums written out in the documented order.
template <typename T>
std::vector<T> referenceDown(const TestImage<T>& src) {
  const int w = src.width(), h = src.height(), ch = src.channels();
  const int ow = (w + 1) / 2, oh = (h + 1) / 2;
  auto hrow = [&](int y, int i, int c) {
    auto p = [&](int d) { return at(src, reflect(2 * i + d, w), y, c); };
    return Acc<T>((p(-2) + p(2)) + (p(-1) + p(1)) * Acc<T>(4) + p(0) * Acc<T>(6));
  };
  std::vector<T> out(size_t(ow) * oh * ch);
  for (int j = 0; j < oh; ++j)
    for (int i = 0; i < ow; ++i)
      for (int c = 0; c < ch; ++c) {
        T& o = out[(size_t(j) * ow + i) * ch + c];
        if (h <= 2) {
          const Acc<T> s = hrow(0, i, c) + hrow(h - 1, i, c);
          if constexpr (std::is_same<T, float>::value)
            o = s * (1.0f / 32.0f);
          else
            o = T((s * 8 + 128) >> 8);
          continue;
        }
        auto r = [&](int d) { return hrow(reflect(2 * j + d, h), i, c); };
        const Acc<T> s = (r(-2) + r(2)) + (r(-1) + r(1)) * Acc<T>(4) + r(0) * Acc<T>(6);
        if constexpr (std::is_same<T, float>::value)
          o = s * (1.0f / 256.0f);
        else
          o = T((s + 128) >> 8);
      }
  return out;
}

template <typename T>
std::vector<T> referenceUp(const TestImage<T>& src) {
  const int w = src.width(), h = src.height(), ch = src.channels();
  auto prev = [](int k, int n) { return k == 0 ? (n > 1 ? 1 : 0) : k - 1; };
  auto next = [](int k, int n) { return k + 1 < n ? k + 1 : n - 1; };
  // Expanded value of source row y at destination column x.
  auto hrow = [&](int y, int x, int c) {
    const int k = x / 2;
    const Acc<T> a = at(src, prev(k, w), y, c), b = at(src, k, y, c), d = at(src, next(k, w), y, c);
    return x % 2 ? Acc<T>((b + d) * Acc<T>(4)) : Acc<T>((a + d) + b * Acc<T>(6));
  };
  std::vector<T> out(size_t(4) * w * h * ch);
  for (int y = 0; y < 2 * h; ++y)
    for (int x = 0; x < 2 * w; ++x)
      for (int c = 0; c < ch; ++c) {
        const int k = y / 2;
        const Acc<T> a = hrow(prev(k, h), x, c), b = hrow(k, x, c), d = hrow(next(k, h), x, c);
        const Acc<T> s = y % 2 ? Acc<T>((b + d) * Acc<T>(4)) : Acc<T>((a + d) + b * Acc<T>(6));
        T& o = out[(size_t(y) * 2 * w + x) * ch + c];
        if constexpr (std::is_same<T, float>::value)
          o = s * (1.0f / 64.0f);
        else
          o = T((s + 32) >> 6);
      }
  return out;
}

template <typename T>
using GaussFn = ZelStatus (*)(const T*, int, T*, int, ZeliSize, Zel8u*);

template <typename T>
constexpr ZelDataType dataType() {
  return std::is_same<T, Zel8u>::value ? zel8u : std::is_same<T, Zel8s>::value ? zel8s : zel32f;
}

template <typename T>
void fill(TestImage<T>& im, std::mt19937& rng) {
  if constexpr (std::is_same<T, float>::value)
    im.fillRandom(rng, -1000.0f, 1000.0f);
  else
    im.fillRandom(rng, int(std::numeric_limits<T>::min()), int(std::numeric_limits<T>::max()));
}

// Random images against the reference, bit for bit, sentinels intact.
template <typename T>
void compareWithReference(bool down, int channels, GaussFn<T> fn, uint32_t seed) {
  std::mt19937 rng(seed);
  const int stepMultiple = int(sizeof(T));
  for (int trial = 0; trial < 60; ++trial) {
    Layout l = zeltest::randomLayout(rng, trial < 20 ? 9 : 90, trial < 20 ? 7 : 24, channels, stepMultiple,
                                     stepMultiple);
    if (trial == 0) l.width = l.height = 1;
    TestImage<T> src(l);
    fill(src, rng);
    Layout o = zeltest::randomLayout(rng, 1, 1, channels, stepMultiple, stepMultiple);
    o.width = down ? (l.width + 1) / 2 : 2 * l.width;
    o.height = down ? (l.height + 1) / 2 : 2 * l.height;
    TestImage<T> dst(o);
    int bytes = 0;
    ASSERT_EQ((down ? zeliPyrDownGetBufSize_Gauss5x5 : zeliPyrUpGetBufSize_Gauss5x5)(l.width, dataType<T>(),
                                                                                     channels, &bytes),
              zelStatusOk);
    // Any alignment of the buffer will do.
    std::vector<Zel8u> buffer(size_t(bytes) + 1);
    SCOPED_TRACE(testing::Message() << l.width << " x " << l.height << " C" << channels << " pad " << l.padBytes
                                    << " offset " << l.offsetBytes);
    ASSERT_EQ(fn(src.data(), src.step(), dst.data(), dst.step(), src.size(), buffer.data() + (trial & 1)),
              zelStatusOk);
    const std::vector<T> want = down ? referenceDown(src) : referenceUp(src);
    for (int y = 0; y < o.height; ++y)
      ASSERT_EQ(std::memcmp(dst.row(y), &want[size_t(y) * o.width * channels], sizeof(T) * o.width * channels), 0)
          << "row " << y;
    ASSERT_TRUE(dst.sentinelIntact());
  }
}

TEST(PyramidGauss, DownMatchesReference) {
  compareWithReference<Zel8u>(true, 1, zeliPyrDown_Gauss5x5_8u_C1R, 1);
  compareWithReference<Zel8u>(true, 3, zeliPyrDown_Gauss5x5_8u_C3R, 2);
  compareWithReference<Zel8s>(true, 1, zeliPyrDown_Gauss5x5_8s_C1R, 3);
  compareWithReference<Zel8s>(true, 3, zeliPyrDown_Gauss5x5_8s_C3R, 4);
  compareWithReference<Zel32f>(true, 1, zeliPyrDown_Gauss5x5_32f_C1R, 5);
  compareWithReference<Zel32f>(true, 3, zeliPyrDown_Gauss5x5_32f_C3R, 6);
}

TEST(PyramidGauss, UpMatchesReference) {
  compareWithReference<Zel8u>(false, 1, zeliPyrUp_Gauss5x5_8u_C1R, 11);
  compareWithReference<Zel8u>(false, 3, zeliPyrUp_Gauss5x5_8u_C3R, 12);
  compareWithReference<Zel8s>(false, 1, zeliPyrUp_Gauss5x5_8s_C1R, 13);
  compareWithReference<Zel8s>(false, 3, zeliPyrUp_Gauss5x5_8s_C3R, 14);
  compareWithReference<Zel32f>(false, 1, zeliPyrUp_Gauss5x5_32f_C1R, 15);
  compareWithReference<Zel32f>(false, 3, zeliPyrUp_Gauss5x5_32f_C3R, 16);
}

// Worked values: the weights sum to one, the two-row path weighs rows
// equally, and the expansion reflects on the left but repeats on the right.
TEST(PyramidGauss, EdgeRules) {
  std::vector<Zel8u> buffer(4096);
  Zel8u one = 77, out = 0;
  ASSERT_EQ(zeliPyrDown_Gauss5x5_8u_C1R(&one, 1, &out, 1, {1, 1}, buffer.data()), zelStatusOk);
  EXPECT_EQ(out, 77);

  // 5 x 2: row 0 all 0, row 1 all 255: each output is the rows' mean.
  Zel8u two[10] = {0, 0, 0, 0, 0, 255, 255, 255, 255, 255}, half[3] = {};
  ASSERT_EQ(zeliPyrDown_Gauss5x5_8u_C1R(two, 5, half, 3, {5, 2}, buffer.data()), zelStatusOk);
  for (Zel8u v : half) EXPECT_EQ(v, 128);  // (16 * 255 * 8 + 128) >> 8

  // The ramp 0, 10, 20 expands to 2.5, 5 (left reflected), ..., 20, 20.
  Zel32f ramp[3] = {0, 10, 20}, up[2][6] = {};
  ASSERT_EQ(zeliPyrUp_Gauss5x5_32f_C1R(ramp, 12, &up[0][0], 24, {3, 1}, buffer.data()), zelStatusOk);
  const Zel32f want[6] = {2.5f, 5.0f, 10.0f, 15.0f, 18.75f, 20.0f};
  for (int y = 0; y < 2; ++y)
    for (int x = 0; x < 6; ++x) EXPECT_EQ(up[y][x], want[x]) << x;
}

TEST(PyramidGauss, ChecksInOrderAndWriteNothingOnFailure) {
  std::vector<Zel8u> buffer(4096);
  Zel32f src[64] = {}, dst[64];
  auto down = [&](const Zel32f* s, int ss, Zel32f* d, int ds, ZeliSize r, Zel8u* b) {
    return zeliPyrDown_Gauss5x5_32f_C1R(s, ss, d, ds, r, b);
  };
  auto up = [&](const Zel32f* s, int ss, Zel32f* d, int ds, ZeliSize r, Zel8u* b) {
    return zeliPyrUp_Gauss5x5_32f_C1R(s, ss, d, ds, r, b);
  };
  std::memset(dst, 0x5A, sizeof dst);
  Zel8u* b = buffer.data();
  EXPECT_EQ(down(nullptr, 16, dst, 8, {0, 4}, b), zelStatusNullPointer);
  EXPECT_EQ(down(src, 16, nullptr, 8, {4, 4}, b), zelStatusNullPointer);
  EXPECT_EQ(down(src, 16, dst, 8, {4, 4}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(down(src, 0, dst, 0, {0, 4}, b), zelStatusBadSize);
  EXPECT_EQ(down(src, 16, dst, 8, {4, -1}, b), zelStatusBadSize);
  EXPECT_EQ(down(src, 15, dst, 8, {4, 4}, b), zelStatusBadStep);
  EXPECT_EQ(down(src, 16, dst, 7, {4, 4}, b), zelStatusBadStep);
  EXPECT_EQ(down(src, 12, dst, 12, {5, 4}, b), zelStatusBadStep);  // 3 outputs need 12 bytes, the source 20
  EXPECT_EQ(down(src, 18, dst, 8, {4, 4}, b), zelStatusMisalignedStep);
  EXPECT_EQ(down(src, 16, dst, 10, {4, 4}, b), zelStatusMisalignedStep);
  EXPECT_EQ(up(src, 16, dst, 31, {4, 2}, b), zelStatusBadStep);
  EXPECT_EQ(up(src, 16, dst, 34, {4, 2}, b), zelStatusMisalignedStep);
  EXPECT_EQ(up(src, -16, dst, 32, {4, 2}, b), zelStatusBadStep);
  for (size_t i = 0; i < 64; ++i) {
    uint32_t bits;
    std::memcpy(&bits, &dst[i], 4);
    ASSERT_EQ(bits, 0x5A5A5A5Au);
  }
  // One-byte types take any step at or above the row bytes.
  Zel8u s8[64] = {}, d8[64] = {};
  EXPECT_EQ(zeliPyrDown_Gauss5x5_8u_C3R(s8, 13, d8, 7, {4, 4}, b), zelStatusOk);
  EXPECT_EQ(zeliPyrDown_Gauss5x5_8u_C3R(s8, 11, d8, 7, {4, 4}, b), zelStatusBadStep);
  EXPECT_EQ(zeliPyrUp_Gauss5x5_8s_C1R(reinterpret_cast<Zel8s*>(s8), 3, reinterpret_cast<Zel8s*>(d8), 5, {3, 3}, b),
            zelStatusBadStep);
}

TEST(PyramidGauss, BufferQueries) {
  for (int w : {1, 2, 3, 4, 5, 15, 16, 17, 640, 1919, 1 << 20})
    for (ZelDataType t : {zel8u, zel8s, zel32f})
      for (int c : {1, 3}) {
        int down = -1, up = -1;
        ASSERT_EQ(zeliPyrDownGetBufSize_Gauss5x5(w, t, c, &down), zelStatusOk);
        ASSERT_EQ(zeliPyrUpGetBufSize_Gauss5x5(w, t, c, &up), zelStatusOk);
        EXPECT_EQ(down, ((int64_t(w) * 4 * c + 15) >> 4) * 96 + 64);
        EXPECT_EQ(up, ((int64_t(w) * 8 * c + 15) >> 4) * 48 + 64);
      }
  int size = 7;
  EXPECT_EQ(zeliPyrDownGetBufSize_Gauss5x5(0, 99, 2, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliPyrDownGetBufSize_Gauss5x5(0, 99, 2, &size), zelStatusBadSize);
  EXPECT_EQ(zeliPyrUpGetBufSize_Gauss5x5(4, zel16u, 2, &size), zelStatusBadDataType);
  EXPECT_EQ(zeliPyrUpGetBufSize_Gauss5x5(4, zel8u, 2, &size), zelStatusBadChannels);
  EXPECT_EQ(zeliPyrUpGetBufSize_Gauss5x5(4, zel8u, 4, &size), zelStatusBadChannels);
  EXPECT_EQ(zeliPyrDownGetBufSize_Gauss5x5(1 << 30, zel32f, 3, &size), zelStatusBadSize);  // beyond an int
  EXPECT_EQ(size, 7);
}

}  // namespace
