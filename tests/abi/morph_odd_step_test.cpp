// Flat and compound morphology on rows that are misaligned for their
// elements (32f steps that are not multiples of 4, which these families
// accept) and with work buffers at odd addresses: results must equal those
// of the same calls on aligned memory. Under the undefined-behaviour
// sanitizer every misaligned element access in the library fails the test.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "abi/morph_support.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using morphtest::Mask;
using zeltest::Layout;
using zeltest::TestImage;

constexpr int kMargin = 8;  // real pixels around the ROI for in-memory borders

int randomIn(std::mt19937& rng, int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); }

// An image in plain bytes at a step of the row bytes plus an odd count, so
// that rows after the first are misaligned for elements of 2 or 4 bytes.
// The test touches it only through memcpy.
struct OddImage {
  int rowBytes, height, step;
  std::vector<uint8_t> bytes;
  OddImage(int rowBytes_, int height_, int pad)
      : rowBytes(rowBytes_), height(height_), step(rowBytes_ + pad), bytes(size_t(step) * height_ + 64) {}
  uint8_t* row(int y) { return bytes.data() + 16 + size_t(y) * step; }  // row 0 stays aligned
  template <typename T>
  void copyFrom(const TestImage<T>& im) {
    for (int y = 0; y < height; ++y) std::memcpy(row(y), im.row(y), size_t(rowBytes));
  }
  template <typename T>
  bool sameAs(const TestImage<T>& im) {
    for (int y = 0; y < height; ++y)
      if (std::memcmp(row(y), im.row(y), size_t(rowBytes)) != 0) return false;
    return true;
  }
};

template <typename T>
TestImage<T> randomImage(std::mt19937& rng, int width, int height, int channels) {
  TestImage<T> im(Layout{width, height, channels, 0, 0});
  im.fillRandom(rng, T(0), T(100));
  return im;
}

// The source framed by kMargin pixels, aligned and at an odd step; the
// destination likewise.
struct Images {
  TestImage<Zel32f> src, dst;
  OddImage oddSrc, oddDst;
  int channels;
  Images(std::mt19937& rng, ZeliSize roi, int c, int pad)
      : src(randomImage<Zel32f>(rng, roi.width + 2 * kMargin, roi.height + 2 * kMargin, c)),
        dst(randomImage<Zel32f>(rng, roi.width, roi.height, c)),
        oddSrc(src.width() * c * 4, src.height(), pad),
        oddDst(roi.width * c * 4, roi.height, pad),
        channels(c) {
    oddSrc.copyFrom(src);
    oddDst.copyFrom(dst);
  }
  const Zel32f* srcRoi() { return &src.at(kMargin, kMargin, 0); }
  const Zel32f* oddSrcRoi() {
    return reinterpret_cast<const Zel32f*>(oddSrc.row(kMargin) + size_t(kMargin) * channels * 4);
  }
  Zel32f* oddDstData() { return reinterpret_cast<Zel32f*>(oddDst.row(0)); }
};

TEST(MorphOddSteps, DilateAndErode32fMatchAlignedRows) {
  std::mt19937 rng(2468);
  for (const auto& api : morphtest::apis<Zel32f>()) {
    SCOPED_TRACE(api.name);
    for (int iteration = 0; iteration < 60; ++iteration) {
      const Mask mask = morphtest::makeMask(rng, morphtest::randomShape(rng), randomIn(rng, 1, 7), randomIn(rng, 1, 7));
      const ZeliSize roi = {randomIn(rng, 1, iteration % 4 == 0 ? 150 : 40), randomIn(rng, 1, 12)};
      const ZeliBorderType border = morphtest::randomBorder(rng);
      const int pad = 2 * randomIn(rng, 0, 3) + 1 + (iteration % 2);  // odd, or 2 mod 4
      int stateSize = 0, bufferSize = 0;
      ASSERT_EQ(api.borderGetSize(roi.width, mask.size(), &stateSize, &bufferSize), zelStatusOk);
      std::vector<uint8_t> state(static_cast<size_t>(stateSize)), buffer(size_t(bufferSize) + 1);
      auto* st = reinterpret_cast<ZeliMorphState*>(state.data());
      ASSERT_EQ(api.borderInit(roi.width, mask.on.data(), mask.size(), st, buffer.data()), zelStatusOk);
      for (bool dilate : {true, false}) {
        Images im(rng, roi, api.channels, pad);
        const auto& fn = dilate ? api.dilate : api.erode;
        ASSERT_EQ(fn(im.srcRoi(), im.src.step(), im.dst.data(), im.dst.step(), roi, border, st, buffer.data()),
                  zelStatusOk);
        ASSERT_EQ(fn(im.oddSrcRoi(), im.oddSrc.step, im.oddDstData(), im.oddDst.step, roi, border, st,
                     buffer.data() + 1),
                  zelStatusOk);
        EXPECT_TRUE(im.oddDst.sameAs(im.dst)) << "iteration " << iteration << " dilate " << dilate;
      }
      // The older interface, replicated border only.
      int size = 0;
      ASSERT_EQ(api.getSize(roi.width, mask.on.data(), mask.size(), &size), zelStatusOk);
      std::vector<uint8_t> older(size_t(size) + 3);
      auto* ost = reinterpret_cast<ZeliMorphState*>(older.data() + 3);
      ASSERT_EQ(api.init(roi.width, mask.on.data(), mask.size(), {0, 0}, ost), zelStatusOk);
      Images im(rng, roi, api.channels, pad);
      ASSERT_EQ(api.dilateReplicate(im.srcRoi(), im.src.step(), im.dst.data(), im.dst.step(), roi, zelBorderReplicate,
                                    ost),
                zelStatusOk);
      ASSERT_EQ(api.dilateReplicate(im.oddSrcRoi(), im.oddSrc.step, im.oddDstData(), im.oddDst.step, roi,
                                    zelBorderReplicate, ost),
                zelStatusOk);
      EXPECT_TRUE(im.oddDst.sameAs(im.dst)) << "older interface, iteration " << iteration;
    }
  }
}

// ---- Compound morphology -------------------------------------------------------
template <typename T>
struct AdvApi {
  std::string name;
  int channels;
  using Fn = std::function<ZelStatus(const T*, int, T*, int, ZeliSize, ZeliBorderType, const ZeliMorphAdvState*,
                                     Zel8u*)>;
  Fn op[5];
  ZelStatus (*getSize)(ZeliSize, ZeliSize, int*, int*);
  ZelStatus (*init)(ZeliSize, Zel8u*, ZeliSize, ZeliMorphAdvState*, Zel8u*);
};
#define ODD_ADV_FN(fn, T)                                                                                     \
  [](const T* s, int ss, T* d, int ds, ZeliSize r, ZeliBorderType b, const ZeliMorphAdvState* st, Zel8u* buf) { \
    static const T value[4] = {};                                                                             \
    return fn(s, ss, d, ds, r, b, ODD_ADV_VALUE, st, buf);                                                    \
  }
#define ODD_ADV_API(t, T, C)                                                                                   \
  [] {                                                                                                         \
    AdvApi<T> a;                                                                                               \
    a.name = #t "_C" #C;                                                                                       \
    a.channels = C;                                                                                            \
    a.op[0] = ODD_ADV_FN(zeliMorphOpenBorder_##t##_C##C##R, T);                                                \
    a.op[1] = ODD_ADV_FN(zeliMorphCloseBorder_##t##_C##C##R, T);                                               \
    a.op[2] = ODD_ADV_FN(zeliMorphTophatBorder_##t##_C##C##R, T);                                              \
    a.op[3] = ODD_ADV_FN(zeliMorphBlackhatBorder_##t##_C##C##R, T);                                            \
    a.op[4] = ODD_ADV_FN(zeliMorphGradientBorder_##t##_C##C##R, T);                                            \
    a.getSize = zeliMorphAdvGetSize_##t##_C##C##R;                                                             \
    a.init = zeliMorphAdvInit_##t##_C##C##R;                                                                   \
    return a;                                                                                                  \
  }()
// One-channel members take the border value by value, the others by array.
#define ODD_ADV_VALUE value[0]
std::vector<AdvApi<Zel32f>> advApis32fC1() { return {ODD_ADV_API(32f, Zel32f, 1)}; }
template <typename T> std::vector<AdvApi<T>> advApis16();
template <> std::vector<AdvApi<Zel16u>> advApis16() { return {ODD_ADV_API(16u, Zel16u, 1)}; }
template <> std::vector<AdvApi<Zel16s>> advApis16() { return {ODD_ADV_API(16s, Zel16s, 1)}; }
#undef ODD_ADV_VALUE
#define ODD_ADV_VALUE value
std::vector<AdvApi<Zel32f>> advApis32fMulti() { return {ODD_ADV_API(32f, Zel32f, 3), ODD_ADV_API(32f, Zel32f, 4)}; }
#undef ODD_ADV_VALUE

std::vector<AdvApi<Zel32f>> advApis32f() {
  std::vector<AdvApi<Zel32f>> all = advApis32fC1(), multi = advApis32fMulti();
  all.insert(all.end(), multi.begin(), multi.end());
  return all;
}

// A state and buffer built at a chosen distance from aligned memory.
struct AdvState {
  std::vector<uint8_t> block, buffer;
  ZeliMorphAdvState* state;
  Zel8u* work;
  template <typename T>
  AdvState(const AdvApi<T>& api, ZeliSize roi, Mask& mask, int offset) {
    int stateSize = 0, bufferSize = 0;
    EXPECT_EQ(api.getSize(roi, mask.size(), &stateSize, &bufferSize), zelStatusOk);
    block.assign(size_t(stateSize) + 64, 0);
    buffer.assign(size_t(bufferSize) + 64, 0);
    state = reinterpret_cast<ZeliMorphAdvState*>(block.data() + offset);
    work = reinterpret_cast<Zel8u*>(
               (reinterpret_cast<uintptr_t>(buffer.data()) + 31) & ~uintptr_t(31)) + offset;
    EXPECT_EQ(api.init(roi, mask.on.data(), mask.size(), state, work), zelStatusOk);
  }
};

TEST(MorphOddSteps, CompoundOperations32fMatchAlignedRows) {
  std::mt19937 rng(1357);
  for (const auto& api : advApis32f()) {
    SCOPED_TRACE(api.name);
    for (int iteration = 0; iteration < 40; ++iteration) {
      Mask mask = morphtest::makeMask(rng, morphtest::randomShape(rng), randomIn(rng, 1, 5), randomIn(rng, 1, 5));
      const ZeliSize roi = {randomIn(rng, 1, iteration % 4 == 0 ? 120 : 30), randomIn(rng, 1, 10)};
      const ZeliBorderType border = morphtest::randomBorder(rng);
      const int pad = 2 * randomIn(rng, 0, 3) + 1 + (iteration % 2);
      AdvState aligned(api, roi, mask, 0), odd(api, roi, mask, 1 + iteration % 3);
      for (int op = 0; op < 5; ++op) {
        Images im(rng, roi, api.channels, pad);
        ASSERT_EQ(api.op[op](im.srcRoi(), im.src.step(), im.dst.data(), im.dst.step(), roi, border, aligned.state,
                             aligned.work),
                  zelStatusOk);
        ASSERT_EQ(api.op[op](im.oddSrcRoi(), im.oddSrc.step, im.oddDstData(), im.oddDst.step, roi, border,
                             odd.state, odd.work),
                  zelStatusOk);
        EXPECT_TRUE(im.oddDst.sameAs(im.dst)) << "operation " << op << " iteration " << iteration;
      }
    }
  }
}

// 16-bit images keep even steps; their buffers (and the intermediate image
// inside them) may still start anywhere.
template <typename T>
class MorphOddBuffers : public ::testing::Test {};
using Types16 = ::testing::Types<Zel16u, Zel16s>;
TYPED_TEST_SUITE(MorphOddBuffers, Types16);

TYPED_TEST(MorphOddBuffers, CompoundOperationsWithBuffersAtOddAddresses) {
  using T = TypeParam;
  std::mt19937 rng(97531);
  for (const auto& api : advApis16<T>()) {
    for (int iteration = 0; iteration < 40; ++iteration) {
      Mask mask = morphtest::makeMask(rng, morphtest::randomShape(rng), randomIn(rng, 1, 5), randomIn(rng, 1, 5));
      const ZeliSize roi = {randomIn(rng, 1, iteration % 4 == 0 ? 120 : 30), randomIn(rng, 1, 10)};
      const ZeliBorderType border = morphtest::randomBorder(rng);
      AdvState aligned(api, roi, mask, 0), odd(api, roi, mask, 1 + 2 * (iteration % 3));
      TestImage<T> src = randomImage<T>(rng, roi.width + 2 * kMargin, roi.height + 2 * kMargin, 1);
      for (int op = 0; op < 5; ++op) {
        TestImage<T> a = randomImage<T>(rng, roi.width, roi.height, 1);
        TestImage<T> b(Layout{roi.width, roi.height, 1, 0, 0});
        const T* roiStart = &src.at(kMargin, kMargin, 0);
        ASSERT_EQ(api.op[op](roiStart, src.step(), a.data(), a.step(), roi, border, aligned.state, aligned.work),
                  zelStatusOk);
        ASSERT_EQ(api.op[op](roiStart, src.step(), b.data(), b.step(), roi, border, odd.state, odd.work),
                  zelStatusOk);
        for (int y = 0; y < roi.height; ++y)
          ASSERT_EQ(std::memcmp(a.row(y), b.row(y), sizeof(T) * roi.width), 0) << "operation " << op;
      }
    }
  }
}

}  // namespace
