// Lens undistortion against a plain reference over random sizes, steps, start
// offsets and cameras, for every type and channel count: the coordinate map,
// bilinear resampling (positions inside, on and outside the edges, exact
// ties, NaN and huge values), the image operation and its agreement with map
// plus resampling, the identity camera, and the argument checks.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <vector>

#include "abi/undistort_reference.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using undistortref::Camera;
using zeltest::Layout;
using zeltest::TestImage;

template <typename T>
using UndistortFn = ZelStatus (*)(const T*, int, T*, int, ZeliSize, Zel32f, Zel32f, Zel32f, Zel32f, Zel32f, Zel32f,
                                  Zel32f, Zel32f, Zel8u*);
template <typename T>
using RemapFn = ZelStatus (*)(const T*, int, ZeliSize, const Zel32f*, int, const Zel32f*, int, T*, int, ZeliSize);

template <typename T>
struct Members {
  UndistortFn<T> undistort;
  RemapFn<T> remap;
  int channels;
  const char* name;
};

const Members<Zel8u> k8u[] = {{zeliUndistortRadial_8u_C1R, zeliRemapBilinear_8u_C1R, 1, "8u_C1R"},
                              {zeliUndistortRadial_8u_C3R, zeliRemapBilinear_8u_C3R, 3, "8u_C3R"}};
const Members<Zel32f> k32f[] = {{zeliUndistortRadial_32f_C1R, zeliRemapBilinear_32f_C1R, 1, "32f_C1R"},
                                {zeliUndistortRadial_32f_C3R, zeliRemapBilinear_32f_C3R, 3, "32f_C3R"}};

template <typename T>
void fillSource(TestImage<T>& im, std::mt19937& rng) {
  if constexpr (std::is_same<T, float>::value)
    im.fillRandom(rng, -100.0f, 100.0f);
  else
    im.fillRandom(rng, 0, 255);
}

template <typename T>
bool sameValue(T a, T b) {
  return std::memcmp(&a, &b, sizeof a) == 0;
}

// A map coordinate for a source dimension n: mostly inside or near the
// edges, sometimes an exact 1/64 tie, far outside, huge, infinite or NaN.
// Interior maps keep whole groups of pixels inside, for the vector path.
float drawCoordinate(std::mt19937& rng, int n, bool interior) {
  if (interior && std::uniform_int_distribution<int>(0, 63)(rng) != 0)
    return std::uniform_int_distribution<int>(0, 1)(rng)
               ? std::uniform_real_distribution<float>(0.0f, float(n) - 1.0f)(rng)
               : float(std::uniform_int_distribution<int>(0, (n - 1) * 64)(rng)) / 64.0f;
  const int kind = std::uniform_int_distribution<int>(0, 19)(rng);
  switch (kind) {
    case 0:
      return float(std::uniform_int_distribution<int>(-3 * 64, (n + 3) * 64)(rng) * 2 + 1) / 64.0f;  // ties
    case 1:
      return std::uniform_real_distribution<float>(-1e9f, 1e9f)(rng);
    case 2:
      return std::numeric_limits<float>::quiet_NaN();
    case 3:
      return std::uniform_int_distribution<int>(0, 1)(rng) ? std::numeric_limits<float>::infinity()
                                                            : -std::numeric_limits<float>::infinity();
    case 4:
      return float(std::uniform_int_distribution<int>(-1, n)(rng));  // whole pixels, including just outside
    default:
      return std::uniform_real_distribution<float>(-2.5f, float(n) + 1.5f)(rng);
  }
}

Camera drawCamera(std::mt19937& rng, int width, int height) {
  std::uniform_real_distribution<float> unit(-1.0f, 1.0f);
  Camera c;
  c.fx = float(width) * (0.6f + 0.5f * (unit(rng) + 1.0f));
  c.fy = float(height) * (0.6f + 0.5f * (unit(rng) + 1.0f)) * (unit(rng) < 0 ? -1.0f : 1.0f);
  c.cx = float(width) * 0.5f + unit(rng) * 3.0f;
  c.cy = float(height) * 0.5f + unit(rng) * 3.0f;
  c.k1 = unit(rng) * 0.4f;
  c.k2 = unit(rng) * 0.1f;
  c.p1 = unit(rng) * 0.02f;
  c.p2 = unit(rng) * 0.02f;
  return c;
}

template <typename T>
void checkRemap(const Members<T>& m, std::mt19937& rng, int trial, int maxWidth = 70, int maxHeight = 5) {
  const int ch = m.channels;
  const int stepMultiple = int(sizeof(T));
  TestImage<T> src(zeltest::randomLayout(rng, 24, 12, ch, stepMultiple, stepMultiple));
  fillSource(src, rng);
  const Layout dl = zeltest::randomLayout(rng, maxWidth, maxHeight, ch, stepMultiple, stepMultiple);
  Layout ml = dl;
  ml.channels = 1;
  ml.padBytes = std::uniform_int_distribution<int>(0, 5)(rng) * 4;
  ml.offsetBytes = std::uniform_int_distribution<int>(0, 3)(rng) * 4;
  // The two maps get their own padding and offsets.
  Layout xl = ml;
  xl.padBytes = std::uniform_int_distribution<int>(0, 5)(rng) * 4;
  xl.offsetBytes = std::uniform_int_distribution<int>(0, 3)(rng) * 4;
  TestImage<float> xMap(xl), yMap(ml);
  const bool interior = trial % 2 == 0;
  for (int y = 0; y < dl.height; ++y)
    for (int x = 0; x < dl.width; ++x) {
      xMap.at(x, y) = drawCoordinate(rng, src.width(), interior);
      yMap.at(x, y) = drawCoordinate(rng, src.height(), interior);
    }
  TestImage<T> dst(dl);
  ASSERT_EQ(m.remap(src.data(), src.step(), src.size(), xMap.data(), xMap.step(), yMap.data(), yMap.step(),
                    dst.data(), dst.step(), dst.size()),
            zelStatusOk);
  ASSERT_TRUE(dst.sentinelIntact()) << m.name << " trial " << trial;
  for (int y = 0; y < dl.height; ++y)
    for (int x = 0; x < dl.width; ++x)
      for (int c = 0; c < ch; ++c) {
        const T want = undistortref::sample(src, xMap.at(x, y), yMap.at(x, y), c);
        ASSERT_TRUE(sameValue(dst.at(x, y, c), want))
            << m.name << " trial " << trial << " pixel " << x << "," << y << " channel " << c << " at ("
            << xMap.at(x, y) << ", " << yMap.at(x, y) << ") src " << src.width() << "x" << src.height() << ": got "
            << double(dst.at(x, y, c)) << " want " << double(want);
      }
}

TEST(Undistort, RemapMatchesReference) {
  std::mt19937 rng(2024);
  for (int trial = 0; trial < 300; ++trial) {
    for (const auto& m : k8u) checkRemap(m, rng, trial);
    for (const auto& m : k32f) checkRemap(m, rng, trial);
  }
}

// Regions several tiles wide and high, with partial tiles at the right and
// bottom.
TEST(Undistort, RemapLargeRegionsMatchReference) {
  std::mt19937 rng(77);
  for (int trial = 0; trial < 12; ++trial) {
    for (const auto& m : k8u) checkRemap(m, rng, trial, 700, 40);
    for (const auto& m : k32f) checkRemap(m, rng, trial, 700, 40);
  }
}

// A source full of whole-pixel positions spread over the interior takes the
// vector path; a NaN neighbour with weight 0 still gives NaN.
TEST(Undistort, RemapInteriorAndZeroWeights) {
  TestImage<float> src(Layout{8, 4, 1, 0, 0});
  for (int y = 0; y < 4; ++y)
    for (int x = 0; x < 8; ++x) src.at(x, y) = float(10 * y + x);
  src.at(3, 1) = std::numeric_limits<float>::quiet_NaN();
  TestImage<float> xm(Layout{8, 1, 1, 0, 0}), ym(Layout{8, 1, 1, 0, 0}), dst(Layout{8, 1, 1, 0, 0});
  for (int x = 0; x < 8; ++x) {
    xm.at(x, 0) = 0.25f * float(x);
    ym.at(x, 0) = 2.0f;
  }
  xm.at(4, 0) = 2.0f;
  ym.at(4, 0) = 0.0f;  // (2, 0): (3, 1) has weight 0 but is read
  ASSERT_EQ(zeliRemapBilinear_32f_C1R(src.data(), src.step(), src.size(), xm.data(), xm.step(), ym.data(),
                                      ym.step(), dst.data(), dst.step(), dst.size()),
            zelStatusOk);
  EXPECT_EQ(dst.at(0, 0), 20.0f);
  EXPECT_EQ(dst.at(1, 0), 20.25f);
  EXPECT_EQ(dst.at(3, 0), 20.75f);
  EXPECT_TRUE(std::isnan(dst.at(4, 0)));
}

template <typename T>
void checkUndistort(const Members<T>& m, std::mt19937& rng, int trial, bool identity) {
  const int ch = m.channels;
  const int stepMultiple = int(sizeof(T));
  TestImage<T> src(zeltest::randomLayout(rng, 70, 9, ch, stepMultiple, stepMultiple));
  fillSource(src, rng);
  Layout dl = zeltest::randomLayout(rng, 1, 1, ch, stepMultiple, stepMultiple);
  dl.width = src.width();
  dl.height = src.height();
  TestImage<T> dst(dl);
  Camera c = drawCamera(rng, src.width(), src.height());
  if (identity) c.k1 = c.k2 = c.p1 = c.p2 = 0.0f;
  int bufferSize = 0;
  ASSERT_EQ(zeliUndistortGetSize(src.size(), &bufferSize), zelStatusOk);
  ASSERT_EQ(bufferSize, src.width() * 8 + 64);
  // Any alignment: the buffer starts at a random byte offset.
  const int offset = std::uniform_int_distribution<int>(0, 63)(rng);
  std::vector<Zel8u> buffer(size_t(bufferSize) + offset + 64, 0xA5);
  ASSERT_EQ(m.undistort(src.data(), src.step(), dst.data(), dst.step(), src.size(), c.fx, c.fy, c.cx, c.cy, c.k1,
                        c.k2, c.p1, c.p2, buffer.data() + offset),
            zelStatusOk);
  ASSERT_TRUE(dst.sentinelIntact()) << m.name << " trial " << trial;
  for (size_t i = size_t(offset) + size_t(bufferSize); i < buffer.size(); ++i) ASSERT_EQ(buffer[i], 0xA5);

  // The map member, then resampling through it, gives the same bits.
  Layout ml{src.width(), src.height(), 1, std::uniform_int_distribution<int>(0, 3)(rng) * 4, 4};
  TestImage<float> xMap(ml), yMap(ml);
  const Zel32f camera[4] = {c.fx, c.fy, c.cx, c.cy}, coefficients[4] = {c.k1, c.k2, c.p1, c.p2};
  ASSERT_EQ(zeliCreateMapCameraUndistort_32f_C1R(xMap.data(), xMap.step(), yMap.data(), yMap.step(), src.size(),
                                                 camera, coefficients),
            zelStatusOk);
  ASSERT_TRUE(xMap.sentinelIntact() && yMap.sentinelIntact());
  TestImage<T> viaMap(dl);
  ASSERT_EQ(m.remap(src.data(), src.step(), src.size(), xMap.data(), xMap.step(), yMap.data(), yMap.step(),
                    viaMap.data(), viaMap.step(), viaMap.size()),
            zelStatusOk);
  EXPECT_TRUE(viaMap.sameAs(dst)) << m.name << " trial " << trial;

  for (int i = 0; i < src.height(); ++i)
    for (int j = 0; j < src.width(); ++j) {
      float u, v;
      undistortref::sourcePoint(c, j, i, u, v);
      ASSERT_TRUE(sameValue(xMap.at(j, i), u) && sameValue(yMap.at(j, i), v))
          << "map at " << j << "," << i << ": " << xMap.at(j, i) << "," << yMap.at(j, i) << " want " << u << ","
          << v;
      for (int k = 0; k < ch; ++k) {
        const T want = identity ? src.at(j, i, k) : undistortref::sample(src, u, v, k);
        ASSERT_TRUE(sameValue(dst.at(j, i, k), want))
            << m.name << " trial " << trial << " pixel " << j << "," << i << " channel " << k << " got "
            << double(dst.at(j, i, k)) << " want " << double(want);
      }
    }
}

TEST(Undistort, ImageAndMapMatchReference) {
  std::mt19937 rng(77);
  for (int trial = 0; trial < 150; ++trial) {
    for (const auto& m : k8u) checkUndistort(m, rng, trial, false);
    for (const auto& m : k32f) checkUndistort(m, rng, trial, false);
  }
}

TEST(Undistort, ZeroCoefficientsCopyTheImage) {
  std::mt19937 rng(5);
  for (int trial = 0; trial < 60; ++trial) {
    for (const auto& m : k8u) checkUndistort(m, rng, trial, true);
    for (const auto& m : k32f) checkUndistort(m, rng, trial, true);
  }
}

TEST(Undistort, ChecksInOrderAndWriteNothingOnFailure) {
  TestImage<float> src(Layout{6, 4, 1, 8, 0}), dst(Layout{6, 4, 1, 8, 0});
  std::vector<Zel8u> buffer(6 * 8 + 64);
  const ZeliSize roi{6, 4};
  auto call = [&](const float* s, int ss, float* d, int ds, ZeliSize r, float fx, float k1, Zel8u* b) {
    return zeliUndistortRadial_32f_C1R(s, ss, d, ds, r, fx, 5.0f, 3.0f, 2.0f, k1, 0.0f, 0.0f, 0.0f, b);
  };
  const float nan = std::numeric_limits<float>::quiet_NaN();
  EXPECT_EQ(call(nullptr, 0, dst.data(), dst.step(), ZeliSize{0, 0}, 0.0f, 0.0f, buffer.data()), zelStatusNullPointer);
  EXPECT_EQ(call(src.data(), src.step(), dst.data(), dst.step(), roi, 5.0f, 0.0f, nullptr), zelStatusNullPointer);
  EXPECT_EQ(call(src.data(), 2, dst.data(), dst.step(), ZeliSize{6, 0}, 5.0f, 0.0f, buffer.data()), zelStatusBadSize);
  EXPECT_EQ(call(src.data(), 25, dst.data(), 26, roi, 0.0f, 0.0f, buffer.data()), zelStatusMisalignedStep);
  EXPECT_EQ(call(src.data(), 25, dst.data(), 20, roi, 0.0f, 0.0f, buffer.data()), zelStatusBadStep);
  EXPECT_EQ(call(src.data(), src.step(), src.data(), src.step(), roi, 0.0f, 0.0f, buffer.data()),
            zelStatusInPlaceNotSupported);
  EXPECT_EQ(call(src.data(), src.step(), dst.data(), dst.step(), roi, 0.0f, 0.0f, buffer.data()), zelStatusBadArgument);
  EXPECT_EQ(call(src.data(), src.step(), dst.data(), dst.step(), roi, 5.0f, nan, buffer.data()), zelStatusBadArgument);
  EXPECT_EQ(call(src.data(), src.step(), dst.data(), dst.step(), roi, std::numeric_limits<float>::infinity(), 0.0f,
                 buffer.data()),
            zelStatusBadArgument);
  int size = -1;
  EXPECT_EQ(zeliUndistortGetSize(roi, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliUndistortGetSize(ZeliSize{5, 0}, &size), zelStatusBadSize);
  EXPECT_EQ(zeliUndistortGetSize(ZeliSize{0x7FFFFFFF, 1}, &size), zelStatusBadSize);
  EXPECT_EQ(size, -1);
  EXPECT_EQ(zeliUndistortGetSize(ZeliSize{(0x7FFFFFFF - 64) / 8, 1}, &size), zelStatusOk);
  EXPECT_EQ(size, (0x7FFFFFFF - 64) / 8 * 8 + 64);

  // Remap: the source step against the source width, the rest against the ROI.
  TestImage<float> map(Layout{6, 4, 1, 4, 0});
  const ZeliSize small{2, 2};
  auto remap = [&](const float* s, int ss, ZeliSize sz, const float* mx, int ms, float* d, int ds, ZeliSize r) {
    return zeliRemapBilinear_32f_C1R(s, ss, sz, mx, ms, map.data(), map.step(), d, ds, r);
  };
  EXPECT_EQ(remap(src.data(), src.step(), roi, nullptr, 0, dst.data(), dst.step(), ZeliSize{0, 0}),
            zelStatusNullPointer);
  EXPECT_EQ(remap(src.data(), src.step(), ZeliSize{0, 1}, map.data(), 0, dst.data(), dst.step(), roi),
            zelStatusBadSize);
  EXPECT_EQ(remap(src.data(), src.step(), roi, map.data(), map.step(), dst.data(), dst.step(), ZeliSize{1, -1}),
            zelStatusBadSize);
  EXPECT_EQ(remap(src.data(), 8, small, map.data(), map.step(), dst.data(), dst.step(), roi), zelStatusOk);
  EXPECT_EQ(remap(src.data(), 9, small, map.data(), 20, dst.data(), dst.step(), roi), zelStatusBadStep);
  EXPECT_EQ(remap(src.data(), 9, small, map.data(), map.step(), dst.data(), 20, roi), zelStatusBadStep);
  EXPECT_EQ(remap(src.data(), 9, small, map.data(), map.step(), dst.data(), dst.step(), roi), zelStatusMisalignedStep);
  EXPECT_EQ(remap(src.data(), src.step(), roi, map.data(), 26, dst.data(), dst.step(), roi), zelStatusMisalignedStep);
  EXPECT_EQ(remap(src.data(), src.step(), roi, map.data(), map.step(), src.data(), src.step(), roi),
            zelStatusInPlaceNotSupported);

  const Zel32f camera[4] = {5, 5, 3, 2}, coefficients[4] = {0.1f, 0, 0, 0};
  const Zel32f badCamera[4] = {5, 0, 3, 2};
  EXPECT_EQ(zeliCreateMapCameraUndistort_32f_C1R(map.data(), map.step(), dst.data(), dst.step(), roi, camera, nullptr),
            zelStatusNullPointer);
  EXPECT_EQ(zeliCreateMapCameraUndistort_32f_C1R(map.data(), 20, dst.data(), dst.step(), roi, camera, coefficients),
            zelStatusBadStep);
  EXPECT_EQ(zeliCreateMapCameraUndistort_32f_C1R(map.data(), map.step(), dst.data(), dst.step(), roi, badCamera,
                                                 coefficients),
            zelStatusBadArgument);

  // Every refused call above left the images as they were: all zero.
  for (int y = 0; y < 4; ++y)
    for (int x = 0; x < 6; ++x) {
      ASSERT_EQ(src.at(x, y), 0.0f);
      ASSERT_EQ(map.at(x, y), 0.0f);
    }
  EXPECT_TRUE(src.sentinelIntact() && dst.sentinelIntact() && map.sentinelIntact());
}

}  // namespace
