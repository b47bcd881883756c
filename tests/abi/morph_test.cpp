// Flat morphology through the exported interface: every dilation, erosion and
// min/max filter export against a brute-force reference, over random masks of
// every kind, ROI sizes, steps, pointer offsets, border forms and in place.
#include <gtest/gtest.h>

#include <cstring>
#include <random>

#include "morph_support.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using namespace morphtest;
using zeltest::Layout;
using zeltest::TestImage;

template <typename T>
void fillValues(TestImage<T>& image, std::mt19937& rng) {
  // A narrow range now and then, so that equal values and plateaus occur.
  const bool narrow = rng() % 4 == 0;
  if constexpr (std::is_same<T, Zel32f>::value)
    image.fillRandom(rng, narrow ? -2.0f : -1000.0f, narrow ? 2.0f : 1000.0f);
  else if constexpr (std::is_same<T, Zel16s>::value)
    image.fillRandom(rng, narrow ? -2 : -32768, narrow ? 2 : 32767);
  else if constexpr (std::is_same<T, Zel16u>::value)
    image.fillRandom(rng, 0, narrow ? 3 : 65535);
  else
    image.fillRandom(rng, 0, narrow ? 3 : 255);
}

template <typename T>
Layout randomImageLayout(std::mt19937& rng, int width, int height, int channels) {
  Layout l = zeltest::randomLayout(rng, 1, 1, channels, int(sizeof(T)), int(sizeof(T)));
  l.width = width;
  l.height = height;
  return l;
}

int randomIn(std::mt19937& rng, int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); }

// Mostly small ROIs, now and then up to 64 x 48, or rows wide enough for
// several blocks of the widest vectors.
ZeliSize randomRoi(std::mt19937& rng) {
  if (rng() % 3 == 0) return {randomIn(rng, 1, 6), randomIn(rng, 1, 6)};
  if (rng() % 5 == 0) return {randomIn(rng, 65, 260), randomIn(rng, 1, 24)};
  return {randomIn(rng, 1, 64), randomIn(rng, 1, 48)};
}

template <typename T>
::testing::AssertionResult sameImage(const TestImage<T>& got, const TestImage<T>& want) {
  for (int y = 0; y < want.height(); ++y)
    for (int x = 0; x < want.width(); ++x)
      for (int c = 0; c < want.channels(); ++c)
        if (std::memcmp(&got.at(x, y, c), &want.at(x, y, c), sizeof(T)) != 0)
          return ::testing::AssertionFailure() << "first difference at (" << x << ", " << y << ") channel " << c
                                               << ": got " << double(got.at(x, y, c)) << ", want "
                                               << double(want.at(x, y, c));
  return ::testing::AssertionSuccess();
}

constexpr int kMargin = 16;  // room for in-memory borders of masks up to 17 x 17

// A source with a margin of real pixels around the ROI.
template <typename T>
struct Framed {
  TestImage<T> image;
  Source<T> source;
  Framed(std::mt19937& rng, ZeliSize roi, int channels)
      : image(randomImageLayout<T>(rng, roi.width + 2 * kMargin, roi.height + 2 * kMargin, channels)),
        source{&image, kMargin, roi.width, roi.height, channels} {
    fillValues(image, rng);
  }
};

template <typename T>
class MorphTyped : public ::testing::Test {};
using MorphTypes = ::testing::Types<Zel8u, Zel16u, Zel16s, Zel32f>;
TYPED_TEST_SUITE(MorphTyped, MorphTypes);
// The older interface and the min/max filters exist for 8u and 32f only.
template <typename T>
class MorphOlder : public ::testing::Test {};
using OlderTypes = ::testing::Types<Zel8u, Zel32f>;
TYPED_TEST_SUITE(MorphOlder, OlderTypes);

// The newer interface: centre anchor, replicated and in-memory borders, a
// state and a buffer of exactly the reported sizes at odd addresses.
TYPED_TEST(MorphTyped, BorderInterfaceMatchesReference) {
  using T = TypeParam;
  std::mt19937 rng(1234);
  for (const Api<T>& api : apis<T>()) {
    SCOPED_TRACE(api.name);
    for (int iteration = 0; iteration < 250; ++iteration) {
      const Mask mask = makeMask(rng, randomShape(rng), randomIn(rng, 1, 15), randomIn(rng, 1, 15));
      const ZeliSize roi = randomRoi(rng);
      const int maxWidth = roi.width + randomIn(rng, 0, 4);
      const ZeliBorderType border = randomBorder(rng);
      SCOPED_TRACE(::testing::Message() << "iteration " << iteration << " mask " << mask.width << "x"
                                        << mask.height << " roi " << roi.width << "x" << roi.height << " border "
                                        << border);
      int stateSize = 0, bufferSize = 0;
      ASSERT_EQ(api.borderGetSize(maxWidth, mask.size(), &stateSize, &bufferSize), zelStatusOk);
      GuardedBlock state(size_t(stateSize), 1 + iteration % 7), buffer(size_t(bufferSize), 1 + iteration % 5);
      auto* st = reinterpret_cast<ZeliMorphState*>(state.get());
      ASSERT_EQ(api.borderInit(maxWidth, mask.on.data(), mask.size(), st, buffer.get()), zelStatusOk);
      ASSERT_TRUE(state.intact());
      const int ax = (mask.width - 1) / 2, ay = (mask.height - 1) / 2;

      Framed<T> src(rng, roi, api.channels);
      for (bool dilate : {true, false}) {
        TestImage<T> dst(randomImageLayout<T>(rng, roi.width, roi.height, api.channels));
        fillValues(dst, rng);
        const auto& fn = dilate ? api.dilate : api.erode;
        ASSERT_EQ(fn(src.source.roi(), src.source.step(), dst.data(), dst.step(), roi, border, st, buffer.get()),
                  zelStatusOk);
        EXPECT_TRUE(sameImage(dst, reference(dilate, src.source, mask, ax, ay, border))) << "dilate " << dilate;
        EXPECT_TRUE(dst.sentinelIntact());
        EXPECT_TRUE(src.image.sentinelIntact());
        EXPECT_TRUE(buffer.intact());
        EXPECT_TRUE(state.intact());
      }
      // In place: 8u and 32f compute it, 16-bit refuses it.
      if (iteration % 3 == 0) {
        const bool dilate = iteration % 2 == 0;
        TestImage<T> both = cloneImage(src.image);
        Source<T> view{&both, kMargin, roi.width, roi.height, api.channels};
        T* roiPtr = const_cast<T*>(view.roi());
        ZelStatus s = (dilate ? api.dilate : api.erode)(roiPtr, both.step(), roiPtr, both.step(), roi, border, st,
                                                        buffer.get());
        if (sizeof(T) == 2) {
          EXPECT_EQ(s, zelStatusInPlaceNotSupported);
          EXPECT_TRUE(both.sameAs(src.image));
        } else {
          ASSERT_EQ(s, zelStatusOk);
          TestImage<T> want = reference(dilate, src.source, mask, ax, ay, border);
          TestImage<T> got(Layout{roi.width, roi.height, api.channels, 0, 0});
          for (int y = 0; y < roi.height; ++y)
            std::memcpy(got.row(y), &both.at(kMargin, y + kMargin, 0), sizeof(T) * roi.width * api.channels);
          EXPECT_TRUE(sameImage(got, want)) << "in place";
        }
        EXPECT_TRUE(both.sentinelIntact());
      }
    }
  }
}

// The older interface: the caller's anchor anywhere in the mask, border 1
// only, the work memory inside the state (Init into a block of exactly the
// reported size, or InitAlloc).
TYPED_TEST(MorphOlder, ReplicateInterfaceMatchesReference) {
  using T = TypeParam;
  std::mt19937 rng(99);
  for (const Api<T>& api : apis<T>()) {
    SCOPED_TRACE(api.name);
    for (int iteration = 0; iteration < 200; ++iteration) {
      const Mask mask = makeMask(rng, randomShape(rng), randomIn(rng, 1, 15), randomIn(rng, 1, 15));
      const ZeliPoint anchor = {randomIn(rng, 0, mask.width - 1), randomIn(rng, 0, mask.height - 1)};
      const ZeliSize roi = randomRoi(rng);
      const int maxWidth = roi.width + randomIn(rng, 0, 4);
      SCOPED_TRACE(::testing::Message() << "iteration " << iteration);
      int size = 0;
      ASSERT_EQ(api.getSize(maxWidth, mask.on.data(), mask.size(), &size), zelStatusOk);
      GuardedBlock block(size_t(size), 1 + iteration % 7);
      ZeliMorphState* st = nullptr;
      const bool allocated = iteration % 2 == 1;
      if (allocated) {
        ASSERT_EQ(api.initAlloc(maxWidth, mask.on.data(), mask.size(), anchor, &st), zelStatusOk);
      } else {
        st = reinterpret_cast<ZeliMorphState*>(block.get());
        ASSERT_EQ(api.init(maxWidth, mask.on.data(), mask.size(), anchor, st), zelStatusOk);
      }
      Framed<T> src(rng, roi, api.channels);
      for (bool dilate : {true, false}) {
        TestImage<T> dst(randomImageLayout<T>(rng, roi.width, roi.height, api.channels));
        fillValues(dst, rng);
        auto fn = dilate ? api.dilateReplicate : api.erodeReplicate;
        ASSERT_EQ(fn(src.source.roi(), src.source.step(), dst.data(), dst.step(), roi, zelBorderReplicate, st),
                  zelStatusOk);
        EXPECT_TRUE(sameImage(dst, reference(dilate, src.source, mask, anchor.x, anchor.y, zelBorderReplicate)));
        EXPECT_TRUE(dst.sentinelIntact());
        TestImage<T> untouched = cloneImage(dst);
        EXPECT_EQ(fn(src.source.roi(), src.source.step(), dst.data(), dst.step(), roi, zelBorderInMemory, st),
                  zelStatusBadArgument);
        EXPECT_TRUE(dst.sameAs(untouched));
      }
      EXPECT_TRUE(block.intact());
      if (allocated) {
        EXPECT_EQ(zeliMorphologyFree(st), zelStatusOk);
      }
    }
  }
}

// The max/min filters, with masks wide and tall enough to reach the generic
// kernels, and anchors anywhere in the rectangle.
TYPED_TEST(MorphOlder, MinMaxFiltersMatchReference) {
  using T = TypeParam;
  std::mt19937 rng(7);
  for (const Api<T>& api : apis<T>()) {
    SCOPED_TRACE(api.name);
    for (int iteration = 0; iteration < 250; ++iteration) {
      const bool large = iteration % 4 == 0;
      const ZeliSize maskSize = {randomIn(rng, 1, large ? 40 : 15), randomIn(rng, 1, large ? 30 : 15)};
      const ZeliPoint anchor = {randomIn(rng, 0, maskSize.width - 1), randomIn(rng, 0, maskSize.height - 1)};
      const ZeliSize roi = randomRoi(rng);
      Mask mask;
      mask.width = maskSize.width;
      mask.height = maskSize.height;
      mask.on.assign(size_t(maskSize.width) * maskSize.height, 1);
      SCOPED_TRACE(::testing::Message() << "iteration " << iteration << " mask " << maskSize.width << "x"
                                        << maskSize.height << " roi " << roi.width << "x" << roi.height);
      Framed<T> src(rng, roi, api.channels);
      for (bool max : {true, false}) {
        int size = 0, other = 0;
        ASSERT_EQ(api.filterMaxSize(roi.width, maskSize, &size), zelStatusOk);
        ASSERT_EQ(api.filterMinSize(roi.width, maskSize, &other), zelStatusOk);
        EXPECT_EQ(size, other);
        GuardedBlock buffer(size_t(size), 1 + iteration % 9);
        TestImage<T> dst(randomImageLayout<T>(rng, roi.width, roi.height, api.channels));
        auto fn = max ? api.filterMax : api.filterMin;
        ASSERT_EQ(fn(src.source.roi(), src.source.step(), dst.data(), dst.step(), roi, maskSize, anchor,
                     buffer.get()),
                  zelStatusOk);
        TestImage<T> want = reference(max, src.source, mask, anchor.x, anchor.y, zelBorderReplicate);
        EXPECT_TRUE(sameImage(dst, want)) << "max " << max;
        EXPECT_TRUE(dst.sentinelIntact());
        EXPECT_TRUE(buffer.intact());
        if (iteration % 5 == 0) {  // in place
          TestImage<T> both(Layout{roi.width, roi.height, api.channels, 0, 0});
          for (int y = 0; y < roi.height; ++y)
            std::memcpy(both.row(y), &src.image.at(kMargin, y + kMargin, 0), sizeof(T) * roi.width * api.channels);
          ASSERT_EQ(fn(both.data(), both.step(), both.data(), both.step(), roi, maskSize, anchor, buffer.get()),
                    zelStatusOk);
          EXPECT_TRUE(sameImage(both, want)) << "in place";
        }
      }
    }
  }
}

// ---- 1-bit images -------------------------------------------------------------
struct BitImage {
  int bytesPerRow, rows;
  std::vector<Zel8u> bytes;
  int bit(int row, int64_t position) const {
    return (bytes[size_t(row) * bytesPerRow + size_t(position >> 3)] >> (7 - (position & 7))) & 1;
  }
};

TEST(MorphBits, DilateErodeMatchReferenceAtEveryBitOffset) {
  std::mt19937 rng(5);
  for (int iteration = 0; iteration < 400; ++iteration) {
    const Mask mask = makeMask(rng, randomShape(rng), randomIn(rng, 1, 15), randomIn(rng, 1, 15));
    const ZeliSize roi = randomRoi(rng);
    const int srcOffset = iteration % 8, dstOffset = randomIn(rng, 0, 7);
    const ZeliBorderType border = randomBorder(rng);
    SCOPED_TRACE(::testing::Message() << "iteration " << iteration << " roi " << roi.width << "x" << roi.height
                                      << " border " << border);
    // Source: 16 margin pixels (2 bytes) and 16 margin rows around the ROI.
    BitImage src{(32 + srcOffset + roi.width + 7) / 8 + randomIn(rng, 0, 3), roi.height + 32, {}};
    src.bytes.resize(size_t(src.bytesPerRow) * src.rows);
    for (auto& b : src.bytes) b = Zel8u(rng());
    const Zel8u* srcRoi = src.bytes.data() + size_t(16) * src.bytesPerRow + 2;
    auto get = [&](int x, int y) { return Zel8u(src.bit(y + 16, 16 + srcOffset + x)); };

    int stateSize = 0, bufferSize = 0;
    ASSERT_EQ(zeliMorphologyBorderGetSize_1u_C1R(roi.width, mask.size(), &stateSize, &bufferSize), zelStatusOk);
    GuardedBlock state(size_t(stateSize), 1 + iteration % 3), buffer(size_t(bufferSize), 5);
    auto* st = reinterpret_cast<ZeliMorphState*>(state.get());
    ASSERT_EQ(zeliMorphologyBorderInit_1u_C1R(roi.width, mask.on.data(), mask.size(), st, nullptr), zelStatusOk);
    const int ax = (mask.width - 1) / 2, ay = (mask.height - 1) / 2;

    for (bool dilate : {true, false}) {
      const int dstStep = (dstOffset + roi.width + 7) / 8 + randomIn(rng, 0, 2);
      std::vector<Zel8u> dst(size_t(dstStep) * roi.height + 16);
      for (auto& b : dst) b = Zel8u(rng());
      std::vector<Zel8u> want = dst;
      for (int y = 0; y < roi.height; ++y)
        for (int x = 0; x < roi.width; ++x) {
          const Zel8u v = referencePixel<Zel8u>(dilate, mask, ax, ay, border, roi.width, roi.height, x, y, get);
          const int p = dstOffset + x;
          Zel8u& byte = want[size_t(y) * dstStep + p / 8];
          byte = Zel8u(v ? byte | (0x80 >> (p % 8)) : byte & ~(0x80 >> (p % 8)));
        }
      auto fn = dilate ? zeliDilateBorder_1u_C1R : zeliErodeBorder_1u_C1R;
      ASSERT_EQ(fn(srcRoi, src.bytesPerRow, srcOffset, dst.data(), dstStep, dstOffset, roi, border, 0, st,
                   buffer.get()),
                zelStatusOk);
      EXPECT_EQ(dst, want) << "dilate " << dilate;
      EXPECT_TRUE(buffer.intact());
      EXPECT_TRUE(state.intact());
    }
  }
}

// Bit offsets of 8 or more advance by whole bytes.
TEST(MorphBits, LargeBitOffsetsAdvanceByBytes) {
  const Zel8u mask[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};
  int stateSize = 0, bufferSize = 0;
  ASSERT_EQ(zeliMorphologyBorderGetSize_1u_C1R(20, {3, 3}, &stateSize, &bufferSize), zelStatusOk);
  std::vector<Zel8u> state(static_cast<size_t>(stateSize)), buffer(static_cast<size_t>(bufferSize));
  auto* st = reinterpret_cast<ZeliMorphState*>(state.data());
  ASSERT_EQ(zeliMorphologyBorderInit_1u_C1R(20, mask, {3, 3}, st, nullptr), zelStatusOk);
  std::mt19937 rng(3);
  std::vector<Zel8u> src(8 * 6), a(8 * 6, 0), b(8 * 6, 0);
  for (auto& v : src) v = Zel8u(rng());
  ASSERT_EQ(zeliDilateBorder_1u_C1R(src.data(), 8, 11, a.data(), 8, 13, {20, 6}, 1, 0, st, buffer.data()), 0);
  ASSERT_EQ(zeliDilateBorder_1u_C1R(src.data() + 1, 8, 3, b.data() + 1, 8, 5, {20, 6}, 1, 0, st, buffer.data()), 0);
  EXPECT_EQ(a, b);
}

}  // namespace
