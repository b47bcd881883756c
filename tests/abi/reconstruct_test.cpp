// Morphological reconstruction through the exported interface, against the
// plain definition: geodesic dilation (erosion) repeated until nothing
// changes. Random images of every type, both connectivities, markers equal
// to the mask, single-pixel markers, markers above the mask, long winding
// paths; random steps, offsets and buffer addresses; nothing written beyond
// the image or the documented buffer size.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <vector>

#include "support/test_image.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::TestImage;

int randomIn(std::mt19937& rng, int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); }

template <typename T> struct Recon;
#define RECON(T, t, code)                                                               \
  template <> struct Recon<T> {                                                         \
    static constexpr auto dilate = zeliMorphReconstructDilate_##t##_C1IR;               \
    static constexpr auto erode = zeliMorphReconstructErode_##t##_C1IR;                 \
    static constexpr auto bufferSize = zeliMorphReconstructGetBufferSize_##t##_C1;      \
    static constexpr int typeCode = code;                                               \
  };
RECON(Zel8u, 8u, zel8u)
RECON(Zel16u, 16u, zel16u)
RECON(Zel32f, 32f, zel32f)
RECON(Zel64f, 64f, zel64f)
#undef RECON

template <typename T>
T lowest() {
  return std::numeric_limits<T>::has_infinity ? -std::numeric_limits<T>::infinity() : std::numeric_limits<T>::lowest();
}
template <typename T>
T highest() {
  return std::numeric_limits<T>::has_infinity ? std::numeric_limits<T>::infinity() : std::numeric_limits<T>::max();
}

// Row-major plain images for the reference.
template <typename T>
using Plain = std::vector<T>;

template <typename T>
Plain<T> referenceReconstruct(bool dilate, Plain<T> m, const Plain<T>& mask, int w, int h, bool eight) {
  for (size_t i = 0; i < m.size(); ++i) m[i] = dilate ? std::min(m[i], mask[i]) : std::max(m[i], mask[i]);
  for (bool changed = true; changed;) {
    changed = false;
    Plain<T> next(m.size());
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        T best = m[size_t(y * w + x)];
        for (int dy = -1; dy <= 1; ++dy)
          for (int dx = -1; dx <= 1; ++dx) {
            if (!eight && dx && dy) continue;
            const int nx = x + dx, ny = y + dy;
            if (nx < 0 || ny < 0 || nx >= w || ny >= h) continue;
            const T v = m[size_t(ny * w + nx)];
            best = dilate ? std::max(best, v) : std::min(best, v);
          }
        const T k = mask[size_t(y * w + x)];
        next[size_t(y * w + x)] = dilate ? std::min(best, k) : std::max(best, k);
      }
    changed = next != m;
    m.swap(next);
  }
  return m;
}

template <typename T>
T randomValue(std::mt19937& rng, int levels) {
  // A few levels make plateaus and ties; integers keep floats exact.
  const int v = randomIn(rng, 0, levels - 1);
  if (std::is_same<T, Zel8u>::value) return T(v * 255 / std::max(1, levels - 1));
  if (std::is_same<T, Zel16u>::value) return T(v * 65535 / std::max(1, levels - 1));
  return T(v * 3 - 100) / T(4);
}

enum class MarkerKind { Random, EqualToMask, SinglePixel, AboveMask, Maze };

template <typename T>
void makeCase(std::mt19937& rng, MarkerKind kind, bool dilate, int w, int h, Plain<T>& marker, Plain<T>& mask) {
  const size_t n = size_t(w) * size_t(h);
  marker.assign(n, T());
  mask.assign(n, T());
  const int levels = randomIn(rng, 2, 40);
  for (T& v : mask) v = randomValue<T>(rng, levels);
  const T neutral = dilate ? lowest<T>() : highest<T>();
  switch (kind) {
    case MarkerKind::Random:
      // Mostly the neutral value, now and then a seed near the mask.
      for (size_t i = 0; i < n; ++i) marker[i] = rng() % 5 ? neutral : randomValue<T>(rng, levels);
      break;
    case MarkerKind::EqualToMask:
      marker = mask;
      break;
    case MarkerKind::SinglePixel:
      std::fill(marker.begin(), marker.end(), neutral);
      marker[size_t(randomIn(rng, 0, int(n) - 1))] = rng() % 2 ? highest<T>() : randomValue<T>(rng, levels);
      break;
    case MarkerKind::AboveMask:
      for (size_t i = 0; i < n; ++i) marker[i] = randomValue<T>(rng, levels);
      break;
    case MarkerKind::Maze: {
      // Walls of the neutral value and corridors of random heights: values
      // must travel along winding paths, against both scan orders.
      for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) {
          const bool wall = (y % 2 == 1 && x != ((y / 2) % 2 ? 0 : w - 1)) || rng() % 23 == 0;
          T& k = mask[size_t(y * w + x)];
          if (wall) k = neutral;
          else if (rng() % 3 == 0) k = randomValue<T>(rng, levels);
        }
      std::fill(marker.begin(), marker.end(), neutral);
      marker[size_t((h - 1) * w + randomIn(rng, 0, w - 1))] = dilate ? highest<T>() : lowest<T>();
      break;
    }
  }
}

template <typename T>
class Reconstruct : public ::testing::Test {};
using ReconTypes = ::testing::Types<Zel8u, Zel16u, Zel32f, Zel64f>;
TYPED_TEST_SUITE(Reconstruct, ReconTypes);

TYPED_TEST(Reconstruct, MatchesRepeatedGeodesicSteps) {
  using T = TypeParam;
  using R = Recon<T>;
  std::mt19937 rng(77 + sizeof(T));
  const MarkerKind kinds[] = {MarkerKind::Random, MarkerKind::EqualToMask, MarkerKind::SinglePixel,
                              MarkerKind::AboveMask, MarkerKind::Maze};
  for (int iter = 0; iter < 250; ++iter) {
    SCOPED_TRACE(iter);
    const MarkerKind kind = kinds[iter % 5];
    const bool dilate = rng() % 2, eight = rng() % 2;
    const int w = randomIn(rng, 1, rng() % 4 ? 24 : 70), h = randomIn(rng, 1, rng() % 4 ? 20 : 50);
    Plain<T> marker, mask;
    makeCase<T>(rng, kind, dilate, w, h, marker, mask);
    const Plain<T> want = referenceReconstruct<T>(dilate, marker, mask, w, h, eight);

    Layout la = zeltest::randomLayout(rng, 1, 1, 1, int(sizeof(T)), int(sizeof(T)));
    la.width = w;
    la.height = h;
    Layout lb = zeltest::randomLayout(rng, 1, 1, 1, int(sizeof(T)), int(sizeof(T)));
    lb.width = w;
    lb.height = h;
    TestImage<T> srcDst(la), ref(lb);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        srcDst.at(x, y) = marker[size_t(y * w + x)];
        ref.at(x, y) = mask[size_t(y * w + x)];
      }
    int size = 0;
    ASSERT_EQ(R::bufferSize({w, h}, &size), zelStatusOk);
    int untyped = 0;
    ASSERT_EQ(zeliMorphReconstructGetBufferSize({w, h}, R::typeCode, &untyped), zelStatusOk);
    EXPECT_EQ(untyped, size);
    // The buffer at a random address, guarded beyond its documented size.
    const int offset = randomIn(rng, 0, 15);
    std::vector<uint8_t> buffer(size_t(size) + 80, 0xC3);
    auto op = dilate ? R::dilate : R::erode;
    ASSERT_EQ(op(srcDst.data(), srcDst.step(), ref.data(), ref.step(), {w, h}, eight ? zelNormInf : zelNormL1,
                 buffer.data() + offset),
              zelStatusOk);
    for (int i = 0; i < offset; ++i) ASSERT_EQ(buffer[size_t(i)], 0xC3);
    for (size_t i = size_t(offset + size); i < buffer.size(); ++i) ASSERT_EQ(buffer[i], 0xC3);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        ASSERT_EQ(srcDst.at(x, y), want[size_t(y * w + x)])
            << "at (" << x << ", " << y << ") of " << w << "x" << h << (dilate ? " dilation" : " erosion")
            << (eight ? " 8" : " 4") << "-connected, marker kind " << int(kind);
        ASSERT_EQ(ref.at(x, y), mask[size_t(y * w + x)]);
      }
    EXPECT_TRUE(srcDst.sentinelIntact());
    EXPECT_TRUE(ref.sentinelIntact());
  }
}

TYPED_TEST(Reconstruct, RefusesBadArgumentsInOrder) {
  using T = TypeParam;
  using R = Recon<T>;
  T a[4 * 6] = {}, b[4 * 6] = {};
  for (T& v : a) v = T(1);
  std::vector<uint8_t> buffer(4096);
  const int step = 6 * int(sizeof(T));
  int size = 0;
  EXPECT_EQ(R::bufferSize({6, 4}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(R::bufferSize({0, 4}, &size), zelStatusBadSize);
  EXPECT_EQ(R::bufferSize({100000, 100000}, &size), zelStatusBadSize);
  EXPECT_EQ(zeliMorphReconstructGetBufferSize({6, 4}, zel16s, &size), zelStatusBadDataType);
  EXPECT_EQ(zeliMorphReconstructGetBufferSize({0, 4}, zel16s, &size), zelStatusBadSize);
  EXPECT_EQ(R::dilate(nullptr, step, b, step, {0, 4}, 7, buffer.data()), zelStatusNullPointer);
  EXPECT_EQ(R::dilate(a, step, nullptr, step, {6, 4}, 1, buffer.data()), zelStatusNullPointer);
  EXPECT_EQ(R::dilate(a, step, b, step, {6, 4}, 1, nullptr), zelStatusNullPointer);
  EXPECT_EQ(R::erode(a, step, b, step, {6, -1}, 7, buffer.data()), zelStatusBadSize);
  EXPECT_EQ(R::erode(a, step - 1, b, step, {6, 4}, 7, buffer.data()), zelStatusBadStep);
  EXPECT_EQ(R::erode(a, step, b, step - 1, {6, 4}, 7, buffer.data()), zelStatusBadStep);
  if (sizeof(T) > 1) {
    EXPECT_EQ(R::erode(a, step + 1, b, step, {5, 4}, 7, buffer.data()), zelStatusMisalignedStep);
  }
  for (int bad : {0, 3, 4, 8})
    EXPECT_EQ(R::dilate(a, step, b, step, {6, 4}, bad, buffer.data()), zelStatusBadNormType) << bad;
  EXPECT_EQ(R::dilate(a, 1 << 24, b, 1 << 24, {1 << 20, 1 << 20}, 1, buffer.data()), zelStatusBadSize);
  for (const T& v : a) EXPECT_EQ(v, T(1));
}

}  // namespace
