// Sizes at and near INT_MAX: size queries with huge masks and regions, Init
// with the most negative sizes, and compound morphology asked for regions
// far taller or wider than its state and buffer hold. Every answer must be
// a status (never a wrapped size, never a touched pixel); under the
// undefined-behaviour sanitizer any overflowing arithmetic fails the test.
#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "support/guard_page.h"
#include "zelcv.h"

namespace {

const int kHuge[] = {INT_MAX, INT_MAX - 1, INT_MAX - 2, INT_MAX / 2 + 1, 1 << 24, 46341, 65536};
const int kSmall[] = {1, 3, 17};

using BorderQuery = ZelStatus (*)(int, ZeliSize, int*, int*);
using AdvQuery = ZelStatus (*)(ZeliSize, ZeliSize, int*, int*);

// A query's answer: refused with -6 and nothing written, or a positive size.
template <typename Call>
void expectSizeOrRefusal(Call&& call, const std::string& what) {
  int a = -77, b = -77;
  const ZelStatus s = call(&a, &b);
  if (s == zelStatusOk) {
    EXPECT_GT(a, 0) << what;
    EXPECT_TRUE(b == -77 || b > 0) << what;
  } else {
    EXPECT_EQ(s, zelStatusBadSize) << what;
    EXPECT_EQ(a, -77) << what;
    EXPECT_EQ(b, -77) << what;
  }
}

TEST(SizeLimits, MorphologyQueriesWithHugeMasksAndWidths) {
  const BorderQuery border[] = {zeliMorphologyBorderGetSize_8u_C1R,  zeliMorphologyBorderGetSize_8u_C3R,
                                zeliMorphologyBorderGetSize_8u_C4R,  zeliMorphologyBorderGetSize_32f_C1R,
                                zeliMorphologyBorderGetSize_32f_C3R, zeliMorphologyBorderGetSize_32f_C4R,
                                zeliMorphologyBorderGetSize_16u_C1R, zeliMorphologyBorderGetSize_16s_C1R,
                                zeliMorphologyBorderGetSize_1u_C1R};
  const AdvQuery adv[] = {zeliMorphAdvGetSize_8u_C1R,  zeliMorphAdvGetSize_8u_C3R,  zeliMorphAdvGetSize_8u_C4R,
                          zeliMorphAdvGetSize_32f_C1R, zeliMorphAdvGetSize_32f_C3R, zeliMorphAdvGetSize_32f_C4R,
                          zeliMorphAdvGetSize_16u_C1R, zeliMorphAdvGetSize_16s_C1R, zeliMorphAdvGetSize_1u_C1R};
  using FilterQuery = ZelStatus (*)(int, ZeliSize, int*);
  const FilterQuery filter[] = {zeliFilterMaxGetBufferSize_8u_C1R,  zeliFilterMaxGetBufferSize_8u_C3R,
                                zeliFilterMaxGetBufferSize_8u_C4R,  zeliFilterMaxGetBufferSize_32f_C1R,
                                zeliFilterMaxGetBufferSize_32f_C3R, zeliFilterMaxGetBufferSize_32f_C4R,
                                zeliFilterMinGetBufferSize_8u_C1R,  zeliFilterMinGetBufferSize_32f_C4R};
  using OlderQuery = ZelStatus (*)(int, const Zel8u*, ZeliSize, int*);
  const OlderQuery older[] = {zeliMorphologyGetSize_8u_C1R,  zeliMorphologyGetSize_8u_C3R,
                              zeliMorphologyGetSize_8u_C4R,  zeliMorphologyGetSize_32f_C1R,
                              zeliMorphologyGetSize_32f_C3R, zeliMorphologyGetSize_32f_C4R};
  const Zel8u mask[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};  // only ever 3 x 3 of it is real

  std::vector<int> all(std::begin(kHuge), std::end(kHuge));
  all.insert(all.end(), std::begin(kSmall), std::end(kSmall));
  for (int width : all)
    for (int mw : all)
      for (int mh : all) {
        const std::string what =
            "width " + std::to_string(width) + " mask " + std::to_string(mw) + "x" + std::to_string(mh);
        for (BorderQuery q : border)
          expectSizeOrRefusal([&](int* a, int* b) { return q(width, {mw, mh}, a, b); }, what);
        for (AdvQuery q : adv) {
          expectSizeOrRefusal([&](int* a, int* b) { return q({width, 5}, {mw, mh}, a, b); }, what);
          expectSizeOrRefusal([&](int* a, int* b) { return q({5, width}, {mw, mh}, a, b); }, what + " (height)");
        }
        for (FilterQuery q : filter)
          expectSizeOrRefusal([&](int* a, int*) { return q(width, {mw, mh}, a); }, what);
        // The older states read the mask itself (3 x 3 here) unless the
        // mask height alone rules the state out.
        if ((mw <= 3 && mh <= 3) || mh > (1 << 27))
          for (OlderQuery q : older)
            expectSizeOrRefusal([&](int* a, int*) { return q(width, mask, {mw, mh}, a); }, what);
      }
}

TEST(SizeLimits, MostNegativeMaskSizesAreRefusedBeforeAnyArithmetic) {
  using BorderInit = ZelStatus (*)(int, const Zel8u*, ZeliSize, ZeliMorphState*, Zel8u*);
  const BorderInit inits[] = {zeliMorphologyBorderInit_8u_C1R,  zeliMorphologyBorderInit_8u_C3R,
                              zeliMorphologyBorderInit_8u_C4R,  zeliMorphologyBorderInit_32f_C1R,
                              zeliMorphologyBorderInit_32f_C3R, zeliMorphologyBorderInit_32f_C4R,
                              zeliMorphologyBorderInit_16u_C1R, zeliMorphologyBorderInit_16s_C1R,
                              zeliMorphologyBorderInit_1u_C1R};
  using AdvInit = ZelStatus (*)(ZeliSize, Zel8u*, ZeliSize, ZeliMorphAdvState*, Zel8u*);
  const AdvInit advInits[] = {zeliMorphAdvInit_8u_C1R,  zeliMorphAdvInit_32f_C3R, zeliMorphAdvInit_16u_C1R,
                              zeliMorphAdvInit_16s_C1R, zeliMorphAdvInit_1u_C1R};
  Zel8u mask[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};
  std::vector<uint8_t> block(4096, 0x5A), buffer(4096);
  const ZeliSize bad[] = {{INT_MIN, 3}, {3, INT_MIN}, {INT_MIN, INT_MIN}, {INT_MIN + 1, 3}, {0, INT_MIN}};
  for (const ZeliSize m : bad) {
    for (BorderInit init : inits) {
      EXPECT_EQ(init(16, mask, m, reinterpret_cast<ZeliMorphState*>(block.data()), buffer.data()),
                zelStatusBadSize);
      EXPECT_EQ(init(INT_MIN, mask, m, reinterpret_cast<ZeliMorphState*>(block.data()), buffer.data()),
                zelStatusBadSize);
    }
    for (AdvInit init : advInits)
      EXPECT_EQ(init({16, 4}, mask, m, reinterpret_cast<ZeliMorphAdvState*>(block.data()), buffer.data()),
                zelStatusBadSize);
  }
  for (uint8_t b : block) ASSERT_EQ(b, 0x5A) << "a refused Init wrote its state";
}

TEST(SizeLimits, PipelineAndCannyQueriesWithHugeSizes) {
  using Query = ZelStatus (*)(ZeliSize, int, int*);
  const Query queries[] = {zeliFilterRowBorderPipelineGetBufferSize_32f_C3R,
                           zeliFilterRowBorderPipelineGetBufferSize_Low_16s_C3R,
                           zeliFilterRowBorderPipelineGetBufferSize_8u16s_C1R,
                           zeliFilterColumnPipelineGetBufferSize_16s_C3R,
                           zeliFilterColumnPipelineGetBufferSize_Low_16s_C3R,
                           zeliFilterColumnPipelineGetBufferSize_32f_C1R};
  for (int a : kHuge)
    for (int b : kHuge) {
      for (Query q : queries) {
        expectSizeOrRefusal([&](int* out, int*) { return q({a, b}, 3, out); }, "roi");
        expectSizeOrRefusal([&](int* out, int*) { return q({3, 3}, a, out); }, "kernel");
      }
      expectSizeOrRefusal([&](int* out, int*) { return zeliCannyGetSize({a, b}, out); }, "canny");
      for (int mask : {int(zelMaskSize3x3), int(zelMaskSize5x5)})
        expectSizeOrRefusal(
            [&](int* out, int*) { return zeliCannyBorderGetSize({a, b}, zelFilterSobel, mask, zelNormL1, out); },
            "canny border");
    }
}

// ---- Compound morphology against a small state -----------------------------------
// A state for a 13 x 7 region and a 3 x 3 element answers -6 for regions
// whose (widened) intermediate image cannot fit its buffer, before any pixel
// is read: the source is a 13 x 7 image that ends at an inaccessible page.
template <typename T>
struct AdvOps {
  std::function<ZelStatus(const T*, int, T*, int, ZeliSize, ZeliBorderType, const ZeliMorphAdvState*, Zel8u*)>
      op[5];
  ZelStatus (*getSize)(ZeliSize, ZeliSize, int*, int*);
  ZelStatus (*init)(ZeliSize, Zel8u*, ZeliSize, ZeliMorphAdvState*, Zel8u*);
  int channels;
};
#define LIMIT_FN(fn, T, value)                                                                               \
  [](const T* s, int ss, T* d, int ds, ZeliSize r, ZeliBorderType b, const ZeliMorphAdvState* st, Zel8u* buf) { \
    static const T values[4] = {};                                                                             \
    (void)values;                                                                                              \
    return fn(s, ss, d, ds, r, b, value, st, buf);                                                             \
  }
#define LIMIT_OPS(t, T, C, value)                                                                           \
  [] {                                                                                                      \
    AdvOps<T> a;                                                                                            \
    a.op[0] = LIMIT_FN(zeliMorphOpenBorder_##t##_C##C##R, T, value);                                        \
    a.op[1] = LIMIT_FN(zeliMorphCloseBorder_##t##_C##C##R, T, value);                                       \
    a.op[2] = LIMIT_FN(zeliMorphTophatBorder_##t##_C##C##R, T, value);                                      \
    a.op[3] = LIMIT_FN(zeliMorphBlackhatBorder_##t##_C##C##R, T, value);                                    \
    a.op[4] = LIMIT_FN(zeliMorphGradientBorder_##t##_C##C##R, T, value);                                    \
    a.getSize = zeliMorphAdvGetSize_##t##_C##C##R;                                                          \
    a.init = zeliMorphAdvInit_##t##_C##C##R;                                                                \
    a.channels = C;                                                                                         \
    return a;                                                                                               \
  }()

template <typename T>
void checkHugeRegions(const AdvOps<T>& ops) {
  const ZeliSize stateRoi = {13, 7}, maskSize = {3, 3};
  Zel8u mask[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};
  int stateSize = 0, bufferSize = 0;
  ASSERT_EQ(ops.getSize(stateRoi, maskSize, &stateSize, &bufferSize), zelStatusOk);
  std::vector<uint8_t> state(static_cast<size_t>(stateSize)), buffer(static_cast<size_t>(bufferSize));
  auto* st = reinterpret_cast<ZeliMorphAdvState*>(state.data());
  ASSERT_EQ(ops.init(stateRoi, mask, maskSize, st, buffer.data()), zelStatusOk);
  zeltest::GuardedImage<T> src(13, 7, ops.channels, zeltest::GuardSide::After);
  zeltest::GuardedImage<T> dst(13, 7, ops.channels, zeltest::GuardSide::After);
  ASSERT_TRUE(src.ok() && dst.ok());
  const ZeliBorderType borders[] = {zelBorderInMemory, zelBorderReplicate | 0x30, zelBorderReplicate | 0xF0,
                                    zelBorderReplicate, zelBorderReplicate | 0x10, zelBorderReplicate | 0x20};
  for (int height : {INT_MAX, INT_MAX - 1, INT_MAX - 2, INT_MAX - 3, INT_MAX / 2 + 1, 1 << 20})
    for (ZeliBorderType border : borders)
      for (int op = 0; op < 5; ++op)
        EXPECT_EQ(ops.op[op](src.data() + ops.channels, src.step(), dst.data(), dst.step(), {12, height}, border, st,
                             buffer.data()),
                  zelStatusBadSize)
            << "height " << height << " border " << border << " operation " << op;
}

TEST(SizeLimits, CompoundMorphologyRefusesRegionsBeyondItsState) {
  checkHugeRegions(LIMIT_OPS(8u, Zel8u, 1, Zel8u(0)));
  checkHugeRegions(LIMIT_OPS(8u, Zel8u, 3, values));
  checkHugeRegions(LIMIT_OPS(8u, Zel8u, 4, values));
  checkHugeRegions(LIMIT_OPS(16u, Zel16u, 1, Zel16u(0)));
  checkHugeRegions(LIMIT_OPS(16s, Zel16s, 1, Zel16s(0)));
  checkHugeRegions(LIMIT_OPS(32f, Zel32f, 1, 0.0f));
  checkHugeRegions(LIMIT_OPS(32f, Zel32f, 3, values));
  checkHugeRegions(LIMIT_OPS(32f, Zel32f, 4, values));
}

TEST(SizeLimits, CompoundMorphologyOnBitsRefusesRegionsBeyondItsState) {
  const ZeliSize stateRoi = {13, 7}, maskSize = {3, 3};
  Zel8u mask[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};
  int stateSize = 0, bufferSize = 0;
  ASSERT_EQ(zeliMorphAdvGetSize_1u_C1R(stateRoi, maskSize, &stateSize, &bufferSize), zelStatusOk);
  std::vector<uint8_t> state(static_cast<size_t>(stateSize)), buffer(static_cast<size_t>(bufferSize));
  auto* st = reinterpret_cast<ZeliMorphAdvState*>(state.data());
  ASSERT_EQ(zeliMorphAdvInit_1u_C1R(stateRoi, mask, maskSize, st, buffer.data()), zelStatusOk);
  zeltest::GuardedImage<Zel8u> src(2, 7, 1, zeltest::GuardSide::After), dst(2, 7, 1, zeltest::GuardSide::After);
  ASSERT_TRUE(src.ok() && dst.ok());
  using Bits = ZelStatus (*)(const Zel8u*, int, int, Zel8u*, int, int, ZeliSize, ZeliBorderType, Zel8u,
                             const ZeliMorphAdvState*, Zel8u*);
  const Bits ops[] = {zeliMorphOpenBorder_1u_C1R, zeliMorphCloseBorder_1u_C1R, zeliMorphTophatBorder_1u_C1R,
                      zeliMorphBlackhatBorder_1u_C1R, zeliMorphGradientBorder_1u_C1R};
  for (int height : {INT_MAX, INT_MAX - 1, INT_MAX - 2})
    for (ZeliBorderType border : {int(zelBorderInMemory), zelBorderReplicate | 0x30, int(zelBorderReplicate)})
      for (Bits op : ops)
        EXPECT_EQ(op(src.data(), src.step(), 1, dst.data(), dst.step(), 1, {12, height}, border, 0, st,
                     buffer.data()),
                  zelStatusBadSize)
            << "height " << height << " border " << border;
}

}  // namespace

namespace {

// The squares of the double-precision squared integrals come from a 32-bit
// running sum per row: exact up to 66051 pixels of 255, wrapping beyond.
TEST(SizeLimits, DoubleSquaresKeepTheDocumentedRowLimit) {
  for (int width : {66051, 66052, 70000}) {
    const int height = 2;
    std::vector<Zel8u> src(size_t(width) * height, 255);
    std::vector<Zel32s> sums(size_t(width + 1) * (height + 1));
    std::vector<Zel32f> sumsF(size_t(width + 1) * (height + 1));
    std::vector<Zel64f> sqr(size_t(width + 1) * (height + 1));
    const int sumStep = (width + 1) * 4, sqrStep = (width + 1) * 8;
    const uint64_t rowSquares = uint64_t(width) * 65025;
    const double expected = double(2 * (rowSquares % (uint64_t(1) << 32)));
    ASSERT_EQ(zeliSqrIntegral_8u32s64f_C1R(src.data(), width, sums.data(), sumStep, sqr.data(), sqrStep,
                                           {width, height}, 0, 0.0),
              zelStatusOk);
    EXPECT_EQ(sqr.back(), expected) << width;
    ASSERT_EQ(zeliSqrIntegral_8u32f64f_C1R(src.data(), width, sumsF.data(), sumStep, sqr.data(), sqrStep,
                                           {width, height}, 0.0f, 0.0),
              zelStatusOk);
    EXPECT_EQ(sqr.back(), expected) << width;
    if (width == 66051) {
      EXPECT_EQ(sqr.back(), 2.0 * 66051 * 65025);
    }
    if (width == 70000) {
      EXPECT_EQ(sqr.back(), 513565408.0);
    }
  }
}

}  // namespace
