// Flat and compound morphology on images whose every row ends (or begins)
// exactly at an inaccessible page, widths 1 to 70, with the replicated
// border (which reads nothing outside the ROI): element shapes of every kind
// lead to the rectangle, run and general cores and to the wide-window row
// kernels.
#include <gtest/gtest.h>

#include <functional>
#include <random>
#include <vector>

#include "abi/morph_support.h"
#include "support/guard_page.h"
#include "zelcv.h"

namespace {

using morphtest::Mask;
using zeltest::GuardedImage;
using zeltest::GuardSide;

int randomIn(std::mt19937& rng, int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); }

template <typename T>
void fill(GuardedImage<T>& im, std::mt19937& rng) {
  for (int y = 0; y < im.height(); ++y)
    for (int i = 0; i < im.width() * im.channels(); ++i) im.row(y)[i] = T(rng() % 100);
}

template <typename T>
class MorphGuard : public ::testing::Test {};
using Types = ::testing::Types<Zel8u, Zel16u, Zel16s, Zel32f>;
TYPED_TEST_SUITE(MorphGuard, Types);

TYPED_TEST(MorphGuard, FlatMorphologyTouchesNothingOutsideTheRows) {
  using T = TypeParam;
  std::mt19937 rng(1001);
  for (const auto& api : morphtest::apis<T>()) {
    SCOPED_TRACE(api.name);
    for (GuardSide side : {GuardSide::After, GuardSide::Before})
      for (int width = 1; width <= 70; ++width) {
        const int height = 1 + width % 4;
        // Wide windows now and then, for the kernels of long runs.
        const int mw = width % 7 == 0 ? randomIn(rng, 16, 40) : randomIn(rng, 1, 9);
        const Mask mask = morphtest::makeMask(rng, morphtest::randomShape(rng), mw, randomIn(rng, 1, 5));
        GuardedImage<T> src(width, height, api.channels, side, 0, true), dst(width, height, api.channels, side, 0, true);
        ASSERT_TRUE(src.ok() && dst.ok());
        fill(src, rng);
        int stateSize = 0, bufferSize = 0;
        ASSERT_EQ(api.borderGetSize(width, mask.size(), &stateSize, &bufferSize), zelStatusOk);
        std::vector<uint8_t> state(static_cast<size_t>(stateSize)), buffer(static_cast<size_t>(bufferSize));
        auto* st = reinterpret_cast<ZeliMorphState*>(state.data());
        ASSERT_EQ(api.borderInit(width, mask.on.data(), mask.size(), st, buffer.data()), zelStatusOk);
        for (const auto& fn : {api.dilate, api.erode})
          ASSERT_EQ(fn(src.data(), src.step(), dst.data(), dst.step(), {width, height}, zelBorderReplicate, st,
                       buffer.data()),
                    zelStatusOk)
              << "width " << width << " mask " << mask.width << "x" << mask.height;
        if (!api.filterMax) continue;
        const ZeliSize box = {mw, mask.height};
        const ZeliPoint anchor = {randomIn(rng, 0, box.width - 1), randomIn(rng, 0, box.height - 1)};
        int size = 0;
        ASSERT_EQ(api.filterMaxSize(width, box, &size), zelStatusOk);
        buffer.assign(size_t(size), 0);
        ASSERT_EQ(api.filterMax(src.data(), src.step(), dst.data(), dst.step(), {width, height}, box, anchor,
                                buffer.data()),
                  zelStatusOk);
        ASSERT_EQ(api.filterMin(src.data(), src.step(), dst.data(), dst.step(), {width, height}, box, anchor,
                                buffer.data()),
                  zelStatusOk);
      }
  }
}

// ---- Compound morphology ---------------------------------------------------------
template <typename T>
struct Compound {
  std::function<ZelStatus(const T*, int, T*, int, ZeliSize, const ZeliMorphAdvState*, Zel8u*)> op[5];
  ZelStatus (*getSize)(ZeliSize, ZeliSize, int*, int*);
  ZelStatus (*init)(ZeliSize, Zel8u*, ZeliSize, ZeliMorphAdvState*, Zel8u*);
  int channels;
};
#define GUARD_FN(fn, T, value)                                                                    \
  [](const T* s, int ss, T* d, int ds, ZeliSize r, const ZeliMorphAdvState* st, Zel8u* buf) {     \
    static const T values[4] = {};                                                                \
    (void)values;                                                                                 \
    return fn(s, ss, d, ds, r, zelBorderReplicate, value, st, buf);                               \
  }
#define GUARD_COMPOUND(t, T, C, value)                                   \
  [] {                                                                   \
    Compound<T> a;                                                       \
    a.op[0] = GUARD_FN(zeliMorphOpenBorder_##t##_C##C##R, T, value);     \
    a.op[1] = GUARD_FN(zeliMorphCloseBorder_##t##_C##C##R, T, value);    \
    a.op[2] = GUARD_FN(zeliMorphTophatBorder_##t##_C##C##R, T, value);   \
    a.op[3] = GUARD_FN(zeliMorphBlackhatBorder_##t##_C##C##R, T, value); \
    a.op[4] = GUARD_FN(zeliMorphGradientBorder_##t##_C##C##R, T, value); \
    a.getSize = zeliMorphAdvGetSize_##t##_C##C##R;                       \
    a.init = zeliMorphAdvInit_##t##_C##C##R;                             \
    a.channels = C;                                                      \
    return a;                                                            \
  }()

template <typename T> std::vector<Compound<T>> compounds();
template <> std::vector<Compound<Zel8u>> compounds() {
  return {GUARD_COMPOUND(8u, Zel8u, 1, Zel8u(0)), GUARD_COMPOUND(8u, Zel8u, 3, values),
          GUARD_COMPOUND(8u, Zel8u, 4, values)};
}
template <> std::vector<Compound<Zel16u>> compounds() { return {GUARD_COMPOUND(16u, Zel16u, 1, Zel16u(0))}; }
template <> std::vector<Compound<Zel16s>> compounds() { return {GUARD_COMPOUND(16s, Zel16s, 1, Zel16s(0))}; }
template <> std::vector<Compound<Zel32f>> compounds() {
  return {GUARD_COMPOUND(32f, Zel32f, 1, 0.0f), GUARD_COMPOUND(32f, Zel32f, 3, values),
          GUARD_COMPOUND(32f, Zel32f, 4, values)};
}

TYPED_TEST(MorphGuard, CompoundMorphologyTouchesNothingOutsideTheRows) {
  using T = TypeParam;
  std::mt19937 rng(2002);
  for (const auto& api : compounds<T>())
    for (GuardSide side : {GuardSide::After, GuardSide::Before})
      for (int width = 1; width <= 70; ++width) {
        const int height = 1 + width % 3;
        Mask mask = morphtest::makeMask(rng, morphtest::randomShape(rng), randomIn(rng, 1, 7), randomIn(rng, 1, 4));
        GuardedImage<T> src(width, height, api.channels, side, 0, true), dst(width, height, api.channels, side, 0, true);
        ASSERT_TRUE(src.ok() && dst.ok());
        fill(src, rng);
        int stateSize = 0, bufferSize = 0;
        ASSERT_EQ(api.getSize({width, height}, mask.size(), &stateSize, &bufferSize), zelStatusOk);
        std::vector<uint8_t> state(static_cast<size_t>(stateSize)), buffer(static_cast<size_t>(bufferSize));
        auto* st = reinterpret_cast<ZeliMorphAdvState*>(state.data());
        ASSERT_EQ(api.init({width, height}, mask.on.data(), mask.size(), st, buffer.data()), zelStatusOk);
        for (int op = 0; op < 5; ++op)
          ASSERT_EQ(api.op[op](src.data(), src.step(), dst.data(), dst.step(), {width, height}, st, buffer.data()),
                    zelStatusOk)
              << "width " << width << " operation " << op;
      }
}

}  // namespace
