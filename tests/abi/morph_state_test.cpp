// Flat-morphology states, size rules, argument checks and allocation
// failures through the exported interface.
#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstring>
#include <random>

#include "morph_support.h"
#include "support/fault_injection.h"
#include "zelcv.h"

namespace {

using namespace morphtest;

// The header: five pointer-sized fields, then thirteen 32-bit words.
int32_t headerWord(const void* state, int field) {
  int32_t v;
  std::memcpy(&v, static_cast<const uint8_t*>(state) + 5 * sizeof(void*) + (field - 6) * 4, 4);
  return v;
}
const void* headerPointer(const void* state, int field) {
  const void* p;
  std::memcpy(&p, static_cast<const uint8_t*>(state) + (field - 1) * sizeof(void*), sizeof p);
  return p;
}

struct KindCase {
  const char* what;
  int width, height;
  const char* rows;  // '#' on, '.' off, row after row
  ZeliPoint anchor;  // for the older Init; {-1, -1}: the newer centre anchor
  int expected;
};

Mask maskOf(const KindCase& k) {
  Mask m;
  m.width = k.width;
  m.height = k.height;
  for (const char* c = k.rows; *c; ++c) m.on.push_back(*c == '#' ? Zel8u(1 + (c - k.rows) % 200) : 0);
  return m;
}

TEST(MorphState, ClassifiesMasksAndFillsTheHeader) {
  const KindCase cases[] = {
      {"empty", 3, 3, ".........", {-1, -1}, 3},
      {"full", 5, 3, "###############", {-1, -1}, 1},
      {"rectangle off the anchor", 5, 5, "##..." "##..." "....." "....." ".....", {-1, -1}, 1},
      {"rectangle, anchor in a corner", 4, 3, "...." ".##." ".##.", {0, 0}, 1},
      {"disc", 5, 5, ".###." "#####" "#####" "#####" ".###.", {-1, -1}, 2},
      {"cross", 3, 3, ".#.###.#.", {-1, -1}, 2},
      {"cross, anchor off the column", 3, 3, ".#.###.#.", {0, 0}, 0},
      {"two runs in a row", 5, 1, "##.##", {-1, -1}, 0},
      {"rows with a gap", 3, 3, "###...###", {1, 1}, 2},
      {"anchor row outside the band", 3, 3, "##.###...", {1, 2}, 0},
      {"runs not covering the anchor", 3, 2, "##..##", {0, 0}, 0},
  };
  for (const KindCase& k : cases) {
    SCOPED_TRACE(k.what);
    const Mask m = maskOf(k);
    ASSERT_EQ(m.on.size(), size_t(k.width) * k.height);
    const bool centre = k.anchor.x < 0;
    const ZeliPoint anchor = centre ? ZeliPoint{(k.width - 1) / 2, (k.height - 1) / 2} : k.anchor;
    int size = 0, buffer = 0;
    std::vector<Zel8u> block;
    if (centre) {
      ASSERT_EQ(zeliMorphologyBorderGetSize_8u_C1R(40, m.size(), &size, &buffer), zelStatusOk);
      block.assign(size_t(size) + 1, 0);
      ASSERT_EQ(zeliMorphologyBorderInit_8u_C1R(40, m.on.data(), m.size(), (ZeliMorphState*)(block.data() + 1), nullptr),
                zelStatusOk);
    } else {
      ASSERT_EQ(zeliMorphologyGetSize_8u_C1R(40, m.on.data(), m.size(), &size), zelStatusOk);
      block.assign(size_t(size) + 1, 0);
      ASSERT_EQ(zeliMorphologyInit_8u_C1R(40, m.on.data(), m.size(), anchor, (ZeliMorphState*)(block.data() + 1)),
                zelStatusOk);
    }
    const void* st = block.data() + 1;
    EXPECT_EQ(headerWord(st, 18), k.expected);
    EXPECT_EQ(headerPointer(st, 1), headerPointer(st, 5));
    EXPECT_EQ(headerPointer(st, 2), nullptr);
    EXPECT_EQ(headerPointer(st, 4), nullptr);
    const uint8_t* payload = static_cast<const uint8_t*>(headerPointer(st, 1));
    EXPECT_TRUE(payload > block.data() && payload < block.data() + block.size());
    EXPECT_EQ(std::memcmp(headerPointer(st, 3), m.on.data(), m.on.size()), 0);  // the general kernel's table
    EXPECT_EQ(headerWord(st, 6), k.width);
    EXPECT_EQ(headerWord(st, 7), k.height);
    EXPECT_EQ(headerWord(st, 8), k.expected == 3 ? 0 : anchor.x);
    EXPECT_EQ(headerWord(st, 9), k.expected == 3 ? 0 : anchor.y);
    EXPECT_EQ(headerWord(st, 10), 0);
    EXPECT_EQ(headerWord(st, 11), 0);
    EXPECT_EQ(headerWord(st, 12), (40 + k.width - 1 + 31) / 32 * 32);
    EXPECT_LE(headerWord(st, 13), size);
    if (centre) {
      EXPECT_EQ(headerWord(st, 13), size);
    }
    EXPECT_EQ(headerWord(st, 14), zel8u);
    EXPECT_EQ(headerWord(st, 15), 1);
    EXPECT_EQ(headerWord(st, 16), 40);
    EXPECT_EQ(headerWord(st, 17), -1);
  }
}

// Run masks of 32f with three channels below area 17 and four channels below
// area 49 fall back to the general kind; one channel and 8u keep runs.
TEST(MorphState, FloatMultiChannelRunsDemotedBySmallArea) {
  std::mt19937 rng(1);
  struct Case {
    int width, height, expected3f, expected4f;
  } cases[] = {{3, 5, 0, 0}, {5, 4, 2, 0}, {6, 8, 2, 0}, {7, 7, 2, 2}, {5, 5, 2, 0}};
  for (const Case& c : cases) {
    SCOPED_TRACE(::testing::Message() << c.width << "x" << c.height);
    Mask m = makeMask(rng, Shape::Cross, c.width, c.height);
    auto kindOf = [&](auto getSize, auto init) {
      int size = 0;
      EXPECT_EQ(getSize(16, m.on.data(), m.size(), &size), zelStatusOk);
      std::vector<Zel8u> block(static_cast<size_t>(size));
      EXPECT_EQ(init(16, m.on.data(), m.size(), ZeliPoint{(c.width - 1) / 2, (c.height - 1) / 2},
                     (ZeliMorphState*)block.data()),
                zelStatusOk);
      return headerWord(block.data(), 18);
    };
    EXPECT_EQ(kindOf(zeliMorphologyGetSize_32f_C3R, zeliMorphologyInit_32f_C3R), c.expected3f);
    EXPECT_EQ(kindOf(zeliMorphologyGetSize_32f_C4R, zeliMorphologyInit_32f_C4R), c.expected4f);
    EXPECT_EQ(kindOf(zeliMorphologyGetSize_32f_C1R, zeliMorphologyInit_32f_C1R), 2);
    EXPECT_EQ(kindOf(zeliMorphologyGetSize_8u_C4R, zeliMorphologyInit_8u_C4R), 2);
  }
}

// ---- Size rules, written out independently -----------------------------------
int64_t a16(int64_t n) { return (n + 15) / 16 * 16; }
int64_t fastSize(const std::string& t, int c, int64_t w, int64_t mh) {
  if (t == "16u" || t == "16s") return (4 * w + 80) * mh * 2 + 64;
  if (t == "8u" && c == 1) return (2 * w + 80) * mh + 32;
  if (t == "8u" && c == 3) return ((3 * w + 32) * 2 + 16) * mh + 32;
  if ((t == "8u" && c == 4) || (t == "32f" && c == 1)) return (8 * w + 80) * mh + 32;
  if (t == "32f" && c == 3) return ((12 * w + 32) * 2 + 16) * mh + 32;
  return (32 * w + 80) * mh + 32;
}
int64_t bufferB(const std::string& t, int c, int e, int64_t w, int64_t mw, int64_t mh) {
  int64_t g = (mh * mh + 1) * (w * c * e + 32) + 20 * mh + 36;
  return std::max(fastSize(t, c, w, mh), g) + a16(24 * mh) + a16(mw * mh) + a16(16 * mh + 48);
}

struct SizeApi {
  std::string type;
  int channels, elementSize;
  ZelStatus (*borderGetSize)(int, ZeliSize, int*, int*);
  ZelStatus (*getSize)(int, const Zel8u*, ZeliSize, int*);
  ZelStatus (*maxSize)(int, ZeliSize, int*);
  ZelStatus (*minSize)(int, ZeliSize, int*);
};
#define SIZE_API(t, C, e)                                                                         \
  SizeApi{#t, C, e, zeliMorphologyBorderGetSize_##t##_C##C##R, zeliMorphologyGetSize_##t##_C##C##R, \
          zeliFilterMaxGetBufferSize_##t##_C##C##R, zeliFilterMinGetBufferSize_##t##_C##C##R}

TEST(MorphState, EverySizeQueryFollowsItsRule) {
  const SizeApi apis[] = {SIZE_API(8u, 1, 1),  SIZE_API(8u, 3, 1),  SIZE_API(8u, 4, 1),
                          SIZE_API(32f, 1, 4), SIZE_API(32f, 3, 4), SIZE_API(32f, 4, 4),
                          {"16u", 1, 2, zeliMorphologyBorderGetSize_16u_C1R, nullptr, nullptr, nullptr},
                          {"16s", 1, 2, zeliMorphologyBorderGetSize_16s_C1R, nullptr, nullptr, nullptr},
                          {"1u", 1, 1, zeliMorphologyBorderGetSize_1u_C1R, nullptr, nullptr, nullptr}};
  std::mt19937 rng(11);
  for (const SizeApi& api : apis) {
    SCOPED_TRACE(api.type + " C" + std::to_string(api.channels));
    for (int i = 0; i < 60; ++i) {
      const int w = std::uniform_int_distribution<int>(1, 3000)(rng);
      const ZeliSize m = {std::uniform_int_distribution<int>(1, 40)(rng), std::uniform_int_distribution<int>(1, 40)(rng)};
      const int64_t area = int64_t(m.width) * m.height;
      const bool bits = api.type == "1u";
      const int64_t b = bits ? bufferB("8u", 1, 1, w, m.width, m.height)
                             : bufferB(api.type, api.channels, api.elementSize, w, m.width, m.height);
      int stateSize = -1, bufferSize = -1;
      ASSERT_EQ(api.borderGetSize(w, m, &stateSize, &bufferSize), zelStatusOk);
      EXPECT_EQ(bufferSize, b);
      if (bits)
        EXPECT_EQ(stateSize, a16(area) + 80);
      else if (api.elementSize == 2)
        EXPECT_EQ(stateSize, a16(area) + 16 * m.height + 128);
      else
        EXPECT_EQ(stateSize, 33 * a16(area) + 16 * m.height + 128 + b);
      if (!api.getSize) continue;
      int size = -1, other = -1;
      ASSERT_EQ(api.maxSize(w, m, &size), zelStatusOk);
      ASSERT_EQ(api.minSize(w, m, &other), zelStatusOk);
      EXPECT_EQ(size, fastSize(api.type, api.channels, w, m.height));
      EXPECT_EQ(other, size);
      // C1 by formula (no mask needed); C3/C4 the exact need of this mask,
      // never more than the formula.
      Mask mask = makeMask(rng, randomShape(rng), m.width, m.height);
      ASSERT_EQ(api.getSize(w, api.channels == 1 ? nullptr : mask.on.data(), m, &size), zelStatusOk);
      if (api.channels == 1)
        EXPECT_EQ(size, 33 * a16(area) + 16 * m.height + 128 + b);
      else
        EXPECT_LE(size, 33 * a16(area) + 16 * m.height + 128 + b);
      EXPECT_GE(size, b);
    }
  }
}

TEST(MorphState, SizeQueriesCheckPointersThenSizes) {
  int a = 7, b = 7;
  const Zel8u mask[4] = {1, 1, 1, 1};
  EXPECT_EQ(zeliMorphologyBorderGetSize_8u_C1R(0, {0, 0}, nullptr, &b), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphologyBorderGetSize_16s_C1R(5, {2, 2}, &a, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphologyBorderGetSize_1u_C1R(0, {2, 2}, &a, &b), zelStatusBadSize);
  EXPECT_EQ(zeliMorphologyBorderGetSize_32f_C3R(5, {2, 0}, &a, &b), zelStatusBadSize);
  EXPECT_EQ(zeliFilterMaxGetBufferSize_8u_C1R(0, {0, 0}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliFilterMinGetBufferSize_32f_C4R(0, {0, 0}, &a), zelStatusBadSize);
  EXPECT_EQ(zeliFilterMaxGetBufferSize_8u_C3R(5, {0, 3}, &a), zelStatusBadMaskSize);
  EXPECT_EQ(zeliMorphologyGetSize_8u_C1R(5, mask, {2, 2}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphologyGetSize_32f_C1R(0, mask, {2, 2}, &a), zelStatusBadSize);
  EXPECT_EQ(zeliMorphologyGetSize_8u_C3R(5, nullptr, {2, 2}, &a), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphologyGetSize_8u_C4R(5, mask, {2, 2}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphologyGetSize_32f_C3R(5, mask, {0, 2}, &a), zelStatusBadSize);
  // Sizes beyond 32 bits are refused rather than wrapped.
  EXPECT_EQ(zeliMorphologyBorderGetSize_32f_C4R(1 << 20, {3, 4000}, &a, &b), zelStatusBadSize);
  EXPECT_EQ(zeliFilterMaxGetBufferSize_32f_C4R(1 << 24, {3, 4000}, &a), zelStatusBadSize);
  EXPECT_EQ(a, 7);
  EXPECT_EQ(b, 7);
}

TEST(MorphState, BuilderChecksInOrder) {
  const Zel8u mask[6] = {1, 1, 1, 1, 1, 1};
  std::vector<Zel8u> block(4096);
  auto* st = reinterpret_cast<ZeliMorphState*>(block.data());
  ZeliMorphState* out = nullptr;
  EXPECT_EQ(zeliMorphologyInit_8u_C1R(0, nullptr, {0, 0}, {-1, -1}, st), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphologyInit_8u_C1R(0, mask, {3, 2}, {-1, -1}, st), zelStatusBadSize);
  EXPECT_EQ(zeliMorphologyInit_8u_C3R(4, mask, {3, 0}, {-1, -1}, st), zelStatusBadSize);
  EXPECT_EQ(zeliMorphologyInit_32f_C1R(4, mask, {3, 2}, {3, 0}, nullptr), zelStatusBadAnchor);
  EXPECT_EQ(zeliMorphologyInit_32f_C1R(4, mask, {3, 2}, {0, -1}, st), zelStatusBadAnchor);
  EXPECT_EQ(zeliMorphologyInit_32f_C1R(4, mask, {3, 2}, {0, 0}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphologyInitAlloc_8u_C4R(4, mask, {3, 2}, {0, 2}, &out), zelStatusBadAnchor);
  EXPECT_EQ(zeliMorphologyInitAlloc_8u_C4R(4, mask, {3, 2}, {0, 1}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphologyBorderInit_16u_C1R(4, nullptr, {3, 2}, st, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphologyBorderInit_1u_C1R(0, mask, {3, 2}, st, nullptr), zelStatusBadSize);
  EXPECT_EQ(zeliMorphologyBorderInit_8u_C3R(4, mask, {3, 2}, nullptr, nullptr), zelStatusNullPointer);
  EXPECT_EQ(out, nullptr);
  EXPECT_EQ(zeliMorphologyFree(nullptr), zelStatusNullPointer);
}

// The builder's two scratch blocks and the allocated state are all released
// whichever allocation fails; the output stays untouched.
TEST(MorphState, AllocationFailuresReleaseEverything) {
  const Zel8u mask[9] = {0, 1, 0, 1, 1, 1, 0, 1, 0};
  std::vector<Zel8u> block(1 << 16);
  auto* st = reinterpret_cast<ZeliMorphState*>(block.data());
  for (int failAt = 0; failAt < 3; ++failAt) {
    SCOPED_TRACE(failAt);
    zeltest::FaultInjection faults;
    faults.failAllocationsFrom(failAt);
    ZeliMorphState* out = reinterpret_cast<ZeliMorphState*>(&faults);
    EXPECT_EQ(zeliMorphologyInitAlloc_32f_C3R(20, mask, {3, 3}, {1, 1}, &out), zelStatusOutOfMemory);
    EXPECT_EQ(out, reinterpret_cast<ZeliMorphState*>(&faults));
    EXPECT_EQ(faults.liveBlocks(), 0);
    if (failAt < 2) {
      int size = 5;
      EXPECT_EQ(zeliMorphologyInit_8u_C1R(20, mask, {3, 3}, {1, 1}, st), zelStatusOutOfMemory);
      EXPECT_EQ(zeliMorphologyBorderInit_1u_C1R(20, mask, {3, 3}, st, nullptr), zelStatusOutOfMemory);
      EXPECT_EQ(zeliMorphologyGetSize_8u_C4R(20, mask, {3, 3}, &size), zelStatusOutOfMemory);
      EXPECT_EQ(size, 5);
      EXPECT_EQ(faults.liveBlocks(), 0);
    }
  }
  zeltest::FaultInjection faults;
  ZeliMorphState* out = nullptr;
  ASSERT_EQ(zeliMorphologyInitAlloc_8u_C1R(20, mask, {3, 3}, {1, 1}, &out), zelStatusOk);
  EXPECT_EQ(faults.allocations(), 3);
  EXPECT_EQ(faults.liveBlocks(), 1);
  EXPECT_EQ(zeliMorphologyFree(out), zelStatusOk);
  EXPECT_EQ(faults.liveBlocks(), 0);
  ASSERT_EQ(zeliMorphologyBorderInit_16s_C1R(20, mask, {3, 3}, st, nullptr), zelStatusOk);
  EXPECT_EQ(faults.allocations(), 5);
  EXPECT_EQ(faults.liveBlocks(), 0);
}

}  // namespace
