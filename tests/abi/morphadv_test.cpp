// Compound morphology through the exported ABI: every export against a
// brute-force reference (erosion and dilation written out below, with the
// border rules: replicated sides clamp, in-memory sides read real pixels),
// then the state layout, the size rules and the failure paths.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <functional>
#include <limits>
#include <utility>
#include <random>
#include <string>
#include <vector>

#include "abi/morph_support.h"
#include "support/fault_injection.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using morphtest::Mask;
using zeltest::TestImage;

enum Op { kOpen, kClose, kTophat, kBlackhat, kGradient };
const char* const kOpNames[] = {"open", "close", "tophat", "blackhat", "gradient"};

// ---- Reference ----------------------------------------------------------------
// `get(x, y, c)` reads the source at ROI coordinates, including pixels around
// the ROI; the reference applies the border rule itself.
template <typename V>
struct Reference {
  std::function<V(int, int, int)> get;
  int width, height, channels, border;
  const Mask* mask;
  ZeliPoint anchor;

  int cx(int x) const {
    if ((x < 0 && !morphtest::memLeft(border)) || (x >= width && !morphtest::memRight(border)))
      return morphtest::clampTo(x, width);
    return x;
  }
  int cy(int y) const {
    if ((y < 0 && !morphtest::memTop(border)) || (y >= height && !morphtest::memBottom(border)))
      return morphtest::clampTo(y, height);
    return y;
  }
  // Maximum (or minimum) of f over the element placed at (x, y); `reflected`
  // walks the element through its centre. An empty element copies.
  V over(bool max, bool reflected, int x, int y, int c, const std::function<V(int, int, int)>& f) const {
    bool any = false;
    V best = V();
    for (int j = 0; j < mask->height; ++j)
      for (int i = 0; i < mask->width; ++i) {
        if (!mask->at(i, j)) continue;
        const int dx = i - anchor.x, dy = j - anchor.y;
        const V v = reflected ? f(cx(x - dx), cy(y - dy), c) : f(cx(x + dx), cy(y + dy), c);
        best = !any ? v : max ? std::max(best, v) : std::min(best, v);
        any = true;
      }
    return any ? best : f(x, y, c);
  }
  V source(int x, int y, int c) const { return get(cx(x), cy(y), c); }
  // The first pass, remembered per pixel (the second pass asks for each
  // pixel many times).
  V first(bool max, int x, int y, int c) const {
    const int m = std::max(mask->width, mask->height);
    const size_t at = ((size_t(y + m) * (width + 2 * m)) + size_t(x + m)) * channels + c;
    auto& cache = memo[max];
    if (cache.empty()) cache.assign(size_t(width + 2 * m) * (height + 2 * m) * channels, {false, V()});
    if (!cache[at].first)
      cache[at] = {true, over(max, false, x, y, c, [this](int a, int b, int k) { return source(a, b, k); })};
    return cache[at].second;
  }
  mutable std::vector<std::pair<bool, V>> memo[2];
  // Opening (max == false first) or closing.
  V openClose(bool closing, int x, int y, int c) const {
    return over(!closing, true, x, y, c, [&](int a, int b, int k) { return first(closing, a, b, k); });
  }
};

template <typename V>
V difference(V a, V b) {
  if constexpr (std::is_floating_point<V>::value) {
    const V d = a - b;
    return d > 0 ? d : V(0);
  } else {
    const long long d = (long long)a - (long long)b;
    const long long lo = std::numeric_limits<V>::min(), hi = std::numeric_limits<V>::max();
    return V(std::min(hi, std::max(lo, d)));
  }
}

template <typename V>
V expected(Op op, const Reference<V>& r, int x, int y, int c) {
  switch (op) {
    case kOpen: return r.openClose(false, x, y, c);
    case kClose: return r.openClose(true, x, y, c);
    case kTophat: return difference(r.source(x, y, c), r.openClose(false, x, y, c));
    case kBlackhat: return difference(r.openClose(true, x, y, c), r.source(x, y, c));
    default: return difference(r.first(true, x, y, c), r.first(false, x, y, c));
  }
}

// ---- The exports per type and channel count -------------------------------------
template <typename T>
struct Api {
  std::string name;
  int channels;
  using Fn = std::function<ZelStatus(const T*, int, T*, int, ZeliSize, ZeliBorderType, const ZeliMorphAdvState*,
                                     Zel8u*)>;
  Fn op[5];
  ZelStatus (*getSize)(ZeliSize, ZeliSize, int*, int*);
  ZelStatus (*init)(ZeliSize, Zel8u*, ZeliSize, ZeliMorphAdvState*, Zel8u*);
  ZelStatus (*initAlloc)(ZeliMorphAdvState**, ZeliSize, Zel8u*, ZeliSize, ZeliPoint) = nullptr;
};

#define ADV_FN(fn, T, bv)                                                                                   \
  [](const T* s, int ss, T* d, int ds, ZeliSize r, ZeliBorderType b, const ZeliMorphAdvState* st, Zel8u* buf) { \
    return fn(s, ss, d, ds, r, b, bv, st, buf);                                                             \
  }
#define ADV_API(t, T, C, bv)                                                           \
  [] {                                                                                 \
    Api<T> a;                                                                          \
    a.name = #t "_C" #C;                                                               \
    a.channels = C;                                                                    \
    a.op[kOpen] = ADV_FN(zeliMorphOpenBorder_##t##_C##C##R, T, bv);                    \
    a.op[kClose] = ADV_FN(zeliMorphCloseBorder_##t##_C##C##R, T, bv);                  \
    a.op[kTophat] = ADV_FN(zeliMorphTophatBorder_##t##_C##C##R, T, bv);                \
    a.op[kBlackhat] = ADV_FN(zeliMorphBlackhatBorder_##t##_C##C##R, T, bv);            \
    a.op[kGradient] = ADV_FN(zeliMorphGradientBorder_##t##_C##C##R, T, bv);            \
    a.getSize = zeliMorphAdvGetSize_##t##_C##C##R;                                     \
    a.init = zeliMorphAdvInit_##t##_C##C##R;                                           \
    return a;                                                                          \
  }()

const Zel8u kBv8[4] = {1, 2, 3, 4};
const Zel32f kBv32[4] = {1, 2, 3, 4};

template <typename T> std::vector<Api<T>> apis();
template <> std::vector<Api<Zel8u>> apis() {
  std::vector<Api<Zel8u>> all = {ADV_API(8u, Zel8u, 1, Zel8u(3)), ADV_API(8u, Zel8u, 3, kBv8),
                                 ADV_API(8u, Zel8u, 4, kBv8)};
  all[0].initAlloc = zeliMorphAdvInitAlloc_8u_C1R;
  all[1].initAlloc = zeliMorphAdvInitAlloc_8u_C3R;
  all[2].initAlloc = zeliMorphAdvInitAlloc_8u_C4R;
  return all;
}
template <> std::vector<Api<Zel32f>> apis() {
  std::vector<Api<Zel32f>> all = {ADV_API(32f, Zel32f, 1, 2.0f), ADV_API(32f, Zel32f, 3, kBv32),
                                  ADV_API(32f, Zel32f, 4, kBv32)};
  all[0].initAlloc = zeliMorphAdvInitAlloc_32f_C1R;
  all[1].initAlloc = zeliMorphAdvInitAlloc_32f_C3R;
  all[2].initAlloc = zeliMorphAdvInitAlloc_32f_C4R;
  return all;
}
template <> std::vector<Api<Zel16u>> apis() { return {ADV_API(16u, Zel16u, 1, Zel16u(5))}; }
template <> std::vector<Api<Zel16s>> apis() { return {ADV_API(16s, Zel16s, 1, Zel16s(-5))}; }

template <typename T> void fill(TestImage<T>& im, std::mt19937& rng);
template <> void fill(TestImage<Zel8u>& im, std::mt19937& rng) { im.fillRandom(rng, 0, 255); }
template <> void fill(TestImage<Zel16u>& im, std::mt19937& rng) { im.fillRandom(rng, 0, 65535); }
template <> void fill(TestImage<Zel16s>& im, std::mt19937& rng) { im.fillRandom(rng, -32768, 32767); }
template <> void fill(TestImage<Zel32f>& im, std::mt19937& rng) { im.fillRandom(rng, -100.0f, 100.0f); }

int pick(std::mt19937& rng, int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); }

// A state (at an odd address inside its block) and its buffer, by Init or
// InitAlloc.
struct StateHolder {
  std::vector<uint8_t> block, buffer;
  ZeliMorphAdvState* state = nullptr;
  bool allocated = false;
  ~StateHolder() {
    if (allocated) zeliMorphAdvFree(state);
  }
};

// Random images, masks, anchors, borders and ROIs (up to the state's size)
// through every operation; each result compared with the reference.
template <typename T>
void checkAgainstReference(const Api<T>& api, std::mt19937& rng, int rounds) {
  const int C = api.channels;
  const int stepMultiple = int(sizeof(T));
  for (int round = 0; round < rounds; ++round) {
    const int mw = pick(rng, 1, 6), mh = pick(rng, 1, 6);
    Mask mask = morphtest::makeMask(rng, morphtest::randomShape(rng), mw, mh);
    const ZeliSize maskSize = mask.size();
    // Now and then wide enough for several blocks of the widest vectors.
    const ZeliSize initRoi = {pick(rng, 1, round % 4 == 0 ? 240 : 80), pick(rng, 1, 16)};
    StateHolder h;
    int stateSize = 0, bufferSize = 0;
    ASSERT_EQ(api.getSize(initRoi, maskSize, &stateSize, &bufferSize), zelStatusOk);
    h.buffer.assign(size_t(bufferSize), 0x3C);
    ZeliPoint anchor = {(mw - 1) / 2, (mh - 1) / 2};
    std::vector<Zel8u> maskCopy = mask.on;
    if (api.initAlloc && pick(rng, 0, 2) == 0) {
      anchor = {pick(rng, 0, mw - 1), pick(rng, 0, mh - 1)};
      ASSERT_EQ(api.initAlloc(&h.state, initRoi, mask.on.data(), maskSize, anchor), zelStatusOk);
      h.allocated = true;
    } else {
      const int offset = pick(rng, 0, 7);
      h.block.assign(size_t(stateSize) + 8, 0);
      h.state = reinterpret_cast<ZeliMorphAdvState*>(h.block.data() + offset);
      ASSERT_EQ(api.init(initRoi, mask.on.data(), maskSize, h.state, h.buffer.data()), zelStatusOk);
    }
    ASSERT_EQ(mask.on, maskCopy) << "the mask changed";

    // Often the full size the state serves, else anything smaller.
    const bool full = pick(rng, 0, 1) == 0;
    const ZeliSize roi = {full ? initRoi.width : pick(rng, 1, initRoi.width),
                          full ? initRoi.height : pick(rng, 1, initRoi.height)};
    const int margin = std::max(mw, mh);
    zeltest::Layout sl = zeltest::randomLayout(rng, 1, 1, C, stepMultiple, int(sizeof(T)));
    sl.width = roi.width + 2 * margin;
    sl.height = roi.height + 2 * margin;
    TestImage<T> srcImage(sl);
    fill(srcImage, rng);
    const morphtest::Source<T> src = {&srcImage, margin, roi.width, roi.height, C};
    const ZeliBorderType border = morphtest::randomBorder(rng);
    const Reference<T> ref = {[&](int x, int y, int c) { return src.get(x, y, c); }, roi.width, roi.height, C,
                              border, &mask, anchor, {}};
    for (int op = 0; op < 5; ++op) {
      zeltest::Layout dl = zeltest::randomLayout(rng, 1, 1, C, stepMultiple, int(sizeof(T)));
      dl.width = roi.width;
      dl.height = roi.height;
      TestImage<T> dst(dl);
      fill(dst, rng);
      ASSERT_EQ(api.op[op](src.roi(), src.step(), dst.data(), dst.step(), roi, border, h.state, h.buffer.data()),
                zelStatusOk);
      ASSERT_TRUE(dst.sentinelIntact() && srcImage.sentinelIntact());
      for (int y = 0; y < roi.height; ++y)
        for (int x = 0; x < roi.width; ++x)
          for (int c = 0; c < C; ++c)
            ASSERT_EQ(dst.at(x, y, c), expected(Op(op), ref, x, y, c))
                << api.name << " " << kOpNames[op] << " at " << x << "," << y << "," << c << " border " << border
                << " mask " << mw << "x" << mh << " anchor " << anchor.x << "," << anchor.y << " roi "
                << roi.width << "x" << roi.height;
    }
  }
}

template <typename T>
class MorphAdvTyped : public ::testing::Test {};
using Types = ::testing::Types<Zel8u, Zel16u, Zel16s, Zel32f>;
TYPED_TEST_SUITE(MorphAdvTyped, Types);

TYPED_TEST(MorphAdvTyped, EveryOperationMatchesTheReference) {
  std::mt19937 rng(8101 + sizeof(TypeParam));
  for (const auto& api : apis<TypeParam>()) checkAgainstReference(api, rng, 100);
}

// A caller-memory state and its buffer from GetSize and Init.
struct Built {
  std::vector<uint8_t> block, buffer;
  ZeliMorphAdvState* state() { return reinterpret_cast<ZeliMorphAdvState*>(block.data()); }
  template <typename T>
  bool init(const Api<T>& api, ZeliSize roi, std::vector<Zel8u>& mask, ZeliSize maskSize) {
    int stateSize = 0, bufferSize = 0;
    if (api.getSize(roi, maskSize, &stateSize, &bufferSize) != zelStatusOk) return false;
    block.assign(static_cast<size_t>(stateSize), 0);
    buffer.assign(static_cast<size_t>(bufferSize), 0);
    return api.init(roi, mask.data(), maskSize, state(), buffer.data()) == zelStatusOk;
  }
};

// A mask of zeros: opening and closing copy, the differences are zero.
TYPED_TEST(MorphAdvTyped, EmptyMaskCopiesAndZeroes) {
  std::mt19937 rng(77);
  for (const auto& api : apis<TypeParam>()) {
    std::vector<Zel8u> mask(12, 0);
    const ZeliSize roi = {9, 5}, maskSize = {4, 3};
    Built built;
    ASSERT_TRUE(built.init(api, roi, mask, maskSize));
    ZeliMorphAdvState* s = built.state();
    std::vector<uint8_t>& buffer = built.buffer;
    zeltest::Layout l;
    l.width = roi.width;
    l.height = roi.height;
    l.channels = api.channels;
    TestImage<TypeParam> src(l), dst(l), zero(l);
    fill(src, rng);
    for (int op = 0; op < 5; ++op) {
      fill(dst, rng);
      for (int border : {1, 6}) {
        ASSERT_EQ(api.op[op](src.data(), src.step(), dst.data(), dst.step(), roi, border, s, buffer.data()), 0);
        EXPECT_TRUE(dst.sameAs(op < 2 ? src : zero)) << api.name << " " << kOpNames[op];
      }
    }
  }
}

// Argument failures in their order, nothing written.
TYPED_TEST(MorphAdvTyped, ChecksInOrderWriteNothing) {
  for (const auto& api : apis<TypeParam>()) {
    const int C = api.channels, e = int(sizeof(TypeParam));
    std::vector<Zel8u> mask = {1, 0, 1, 1, 1, 0};
    const ZeliSize roi = {8, 4}, maskSize = {3, 2};
    Built built;
    ASSERT_TRUE(built.init(api, roi, mask, maskSize));
    ZeliMorphAdvState* s = built.state();
    std::vector<uint8_t>& buffer = built.buffer;
    zeltest::Layout l;
    l.width = 12;
    l.height = 12;
    l.channels = C;
    TestImage<TypeParam> src(l), dst(l), before(l);
    const int step = src.step(), row = roi.width * C * e;
    for (int op = 0; op < 5; ++op) {
      auto call = [&](const TypeParam* in, int inStep, TypeParam* out, int outStep, ZeliSize r, int b,
                      const ZeliMorphAdvState* st, Zel8u* buf) { return api.op[op](in, inStep, out, outStep, r, b, st, buf); };
      EXPECT_EQ(call(nullptr, step, dst.data(), step, {0, 4}, 1, s, buffer.data()), zelStatusNullPointer);
      EXPECT_EQ(call(src.data(), step, dst.data(), step, roi, 1, nullptr, buffer.data()), zelStatusNullPointer);
      EXPECT_EQ(call(src.data(), step, dst.data(), step, roi, 1, s, nullptr), zelStatusNullPointer);
      EXPECT_EQ(call(src.data(), row - 1, dst.data(), step, {0, 4}, 1, s, buffer.data()), zelStatusBadSize);
      EXPECT_EQ(call(src.data(), row - 1, dst.data(), step, roi, 3, s, buffer.data()), zelStatusBadStep);
      EXPECT_EQ(call(src.data(), step, dst.data(), row - e, roi, 3, s, buffer.data()), zelStatusBadStep);
      if (e == 2) {
        EXPECT_EQ(call(src.data(), step + 1, dst.data(), step, roi, 3, s, buffer.data()), zelStatusMisalignedStep);
      }
      EXPECT_EQ(call(src.data(), step, dst.data(), step, {9, 4}, 3, s, buffer.data()), zelStatusBadBorder);
      EXPECT_EQ(call(src.data(), step, dst.data(), step, {9, 4}, 0x13, s, buffer.data()), zelStatusBadBorder);
      // Wider than the state, also within the first sub-state's widened width.
      EXPECT_EQ(call(src.data(), step, dst.data(), step, {9, 4}, 1, s, buffer.data()), zelStatusBadSize);
      EXPECT_EQ(call(src.data(), step, dst.data(), step, {10, 1}, 6, s, buffer.data()), zelStatusBadSize);
      // Taller than the intermediate image holds.
      EXPECT_EQ(call(src.data(), step, dst.data(), step, {8, 12}, 1, s, buffer.data()), zelStatusBadSize);
      if (op >= kTophat) {
        EXPECT_EQ(call(src.data(), step, src.data(), step, roi, 1, s, buffer.data()), zelStatusInPlaceNotSupported);
      }
      EXPECT_TRUE(dst.sameAs(before) && dst.sentinelIntact());
    }
  }
}

// Size rules: 2 S + 32 and R (h + mh - 1) + 2 B with S and B of the plain
// width; the queries check pointers before sizes.
TYPED_TEST(MorphAdvTyped, SizesFollowTheFlatRules) {
  const int e = int(sizeof(TypeParam));
  for (const auto& api : apis<TypeParam>()) {
    const int C = api.channels;
    for (ZeliSize mask : {ZeliSize{1, 1}, ZeliSize{3, 5}, ZeliSize{11, 2}}) {
      const ZeliSize roi = {37, 9};
      int s = 0, b = 0, fs = 0, fb = 0;
      ASSERT_EQ(api.getSize(roi, mask, &s, &b), zelStatusOk);
      ZelStatus flat = zelStatusOk;
      if (sizeof(TypeParam) == 1 && C == 1) flat = zeliMorphologyBorderGetSize_8u_C1R(roi.width, mask, &fs, &fb);
      if (sizeof(TypeParam) == 1 && C == 3) flat = zeliMorphologyBorderGetSize_8u_C3R(roi.width, mask, &fs, &fb);
      if (sizeof(TypeParam) == 1 && C == 4) flat = zeliMorphologyBorderGetSize_8u_C4R(roi.width, mask, &fs, &fb);
      if (sizeof(TypeParam) == 4 && C == 1) flat = zeliMorphologyBorderGetSize_32f_C1R(roi.width, mask, &fs, &fb);
      if (sizeof(TypeParam) == 4 && C == 3) flat = zeliMorphologyBorderGetSize_32f_C3R(roi.width, mask, &fs, &fb);
      if (sizeof(TypeParam) == 4 && C == 4) flat = zeliMorphologyBorderGetSize_32f_C4R(roi.width, mask, &fs, &fb);
      if (std::is_same<TypeParam, Zel16u>::value) flat = zeliMorphologyBorderGetSize_16u_C1R(roi.width, mask, &fs, &fb);
      if (std::is_same<TypeParam, Zel16s>::value) flat = zeliMorphologyBorderGetSize_16s_C1R(roi.width, mask, &fs, &fb);
      ASSERT_EQ(flat, zelStatusOk);
      const int rowBytes = ((roi.width + mask.width - 1) * C * e + 31) / 32 * 32;
      EXPECT_EQ(s, 2 * fs + 32);
      EXPECT_EQ(b, rowBytes * (roi.height + mask.height - 1) + 2 * fb);
    }
    int s = 7, b = 7;
    EXPECT_EQ(api.getSize({0, 1}, {1, 1}, nullptr, &b), zelStatusNullPointer);
    EXPECT_EQ(api.getSize({1, 1}, {0, 1}, &s, &b), zelStatusBadSize);
    EXPECT_EQ(api.getSize({1, 0}, {1, 1}, &s, &b), zelStatusBadSize);
    EXPECT_EQ(s, 7);
    std::vector<Zel8u> mask(4, 1);
    std::vector<uint8_t> block(4096);
    auto* st = reinterpret_cast<ZeliMorphAdvState*>(block.data());
    EXPECT_EQ(api.init({4, 4}, nullptr, {2, 2}, st, block.data()), zelStatusNullPointer);
    EXPECT_EQ(api.init({4, 4}, mask.data(), {2, 2}, nullptr, block.data()), zelStatusNullPointer);
    EXPECT_EQ(api.init({4, 4}, mask.data(), {2, 2}, st, nullptr), zelStatusNullPointer);
    EXPECT_EQ(api.init({4, 4}, mask.data(), {2, 0}, st, block.data()), zelStatusBadSize);
  }
}

}  // namespace
