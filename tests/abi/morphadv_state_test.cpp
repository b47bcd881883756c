// Compound morphology: the state layout (header and the two sub-states), the
// allocated form and its failure paths, and 1-bit images against a reference.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <random>
#include <vector>

#include "abi/morph_support.h"
#include "support/fault_injection.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

// The compound header: three pointers then two 32-bit sizes.
struct AdvFields {
  const uint8_t* first;
  const uint8_t* second;
  const uint8_t* image;
  int32_t capacity, workBytes;
};
AdvFields advFields(const void* state) {
  AdvFields f;
  const uint8_t* p = static_cast<const uint8_t*>(state);
  std::memcpy(&f.first, p, sizeof(void*));
  std::memcpy(&f.second, p + sizeof(void*), sizeof(void*));
  std::memcpy(&f.image, p + 2 * sizeof(void*), sizeof(void*));
  std::memcpy(&f.capacity, p + 3 * sizeof(void*), 4);
  std::memcpy(&f.workBytes, p + 3 * sizeof(void*) + 4, 4);
  return f;
}

// Word n (1-based) of a flat state header: five pointers, then 32-bit words.
int32_t flatWord(const uint8_t* state, int n) {
  int32_t v;
  std::memcpy(&v, state + 5 * sizeof(void*) + 4 * (n - 6), 4);
  return v;
}
const uint8_t* flatMaskCopy(const uint8_t* state) {
  const uint8_t* p;
  std::memcpy(&p, state + 2 * sizeof(void*), sizeof p);
  return p;
}

TEST(MorphAdvState, InitLaysOutHeaderAndReflectedSubStates) {
  const ZeliSize roi = {23, 7}, maskSize = {4, 3};
  std::vector<Zel8u> mask = {1, 0, 0, 0, 1, 1, 0, 0, 0, 1, 1, 9};
  const std::vector<Zel8u> original = mask;
  int s, b, fs, fb;
  ASSERT_EQ(zeliMorphAdvGetSize_8u_C3R(roi, maskSize, &s, &b), zelStatusOk);
  ASSERT_EQ(zeliMorphologyBorderGetSize_8u_C3R(roi.width, maskSize, &fs, &fb), zelStatusOk);
  std::vector<uint8_t> block(size_t(s) + 3, 0xEE), buffer(static_cast<size_t>(b));
  uint8_t* state = block.data() + 3;  // any alignment
  ASSERT_EQ(zeliMorphAdvInit_8u_C3R(roi, mask.data(), maskSize, reinterpret_cast<ZeliMorphAdvState*>(state),
                                     buffer.data()),
            zelStatusOk);
  EXPECT_EQ(mask, original);
  const AdvFields f = advFields(state);
  EXPECT_EQ(f.first, state + 32);
  EXPECT_EQ(f.second, state + 32 + fs);
  EXPECT_EQ(f.image, buffer.data() + 2 * fb);
  EXPECT_EQ(f.workBytes, fb);
  EXPECT_EQ(f.capacity, ((roi.width + 3) * 3 + 31) / 32 * 32 * (roi.height + 2));
  EXPECT_EQ(block[size_t(s) + 3 - 1], 0xEE);  // nothing past the reported size... at least its last byte
  // Sub-states: centre anchor and widened width; reflected anchor and plain width.
  EXPECT_EQ(flatWord(f.first, 8), 1);
  EXPECT_EQ(flatWord(f.first, 9), 1);
  EXPECT_EQ(flatWord(f.first, 16), roi.width + 3);
  EXPECT_EQ(flatWord(f.second, 8), 2);
  EXPECT_EQ(flatWord(f.second, 9), 1);
  EXPECT_EQ(flatWord(f.second, 16), roi.width);
  EXPECT_EQ(flatWord(f.first, 14), zel8u);
  EXPECT_EQ(flatWord(f.second, 15), 3);
  std::vector<Zel8u> reflected(original.rbegin(), original.rend());
  EXPECT_TRUE(std::equal(original.begin(), original.end(), flatMaskCopy(f.first)));
  EXPECT_TRUE(std::equal(reflected.begin(), reflected.end(), flatMaskCopy(f.second)));
}

TEST(MorphAdvState, InitAllocKeepsTheCallersAnchorAndFrees) {
  const ZeliSize roi = {10, 6}, maskSize = {5, 3};
  std::vector<Zel8u> mask(15, 1);
  mask[2] = 0;
  const std::vector<Zel8u> original = mask;
  zeltest::FaultInjection faults;
  ZeliMorphAdvState* st = nullptr;
  ASSERT_EQ(zeliMorphAdvInitAlloc_32f_C4R(&st, roi, mask.data(), maskSize, {4, 0}), zelStatusOk);
  EXPECT_EQ(mask, original);
  const AdvFields f = advFields(st);
  ASSERT_TRUE(f.first && f.second && f.image);
  EXPECT_EQ(flatWord(f.first, 8), 4);
  EXPECT_EQ(flatWord(f.first, 9), 0);
  EXPECT_EQ(flatWord(f.second, 8), 0);
  EXPECT_EQ(flatWord(f.second, 9), 2);
  EXPECT_EQ(flatWord(f.first, 14), zel32f);
  EXPECT_EQ(f.capacity, (14 * 16 + 31) / 32 * 32 * 8);
  EXPECT_EQ(faults.liveBlocks(), 4);
  EXPECT_EQ(zeliMorphAdvFree(st), zelStatusOk);
  EXPECT_EQ(faults.liveBlocks(), 0);
  EXPECT_EQ(zeliMorphAdvFree(nullptr), zelStatusNullPointer);
}

TEST(MorphAdvState, InitAllocChecksThenReleasesOnEveryFailure) {
  std::vector<Zel8u> mask = {0, 1, 1, 1, 1, 0};
  const std::vector<Zel8u> original = mask;
  ZeliMorphAdvState* keep = reinterpret_cast<ZeliMorphAdvState*>(&mask);
  ZeliMorphAdvState* out = keep;
  EXPECT_EQ(zeliMorphAdvInitAlloc_8u_C1R(nullptr, {0, 1}, nullptr, {3, 2}, {0, 0}), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphAdvInitAlloc_8u_C1R(&out, {4, 1}, nullptr, {3, 2}, {0, 0}), zelStatusNullPointer);
  EXPECT_EQ(zeliMorphAdvInitAlloc_8u_C1R(&out, {4, 0}, mask.data(), {3, 2}, {0, 0}), zelStatusBadSize);
  EXPECT_EQ(zeliMorphAdvInitAlloc_8u_C1R(&out, {4, 4}, mask.data(), {3, 2}, {3, 0}), zelStatusBadAnchor);
  EXPECT_EQ(zeliMorphAdvInitAlloc_8u_C1R(&out, {4, 4}, mask.data(), {3, 2}, {0, -1}), zelStatusBadAnchor);
  EXPECT_EQ(out, keep);
  for (int failAt = 0;; ++failAt) {
    zeltest::FaultInjection faults;
    faults.failAllocationsFrom(failAt);
    const ZelStatus s = zeliMorphAdvInitAlloc_8u_C1R(&out, {9, 4}, mask.data(), {3, 2}, {2, 1});
    EXPECT_EQ(mask, original);
    if (s == zelStatusOk) {
      EXPECT_GE(failAt, 4);
      EXPECT_EQ(zeliMorphAdvFree(out), zelStatusOk);
      EXPECT_EQ(faults.liveBlocks(), 0);
      break;
    }
    ASSERT_EQ(s, zelStatusOutOfMemory) << failAt;
    EXPECT_EQ(out, keep);
    EXPECT_EQ(faults.liveBlocks(), 0) << failAt;
    ASSERT_LT(failAt, 20);
  }
}

// Init fails with the first sub-state's failure (scratch allocation) and
// leaves the mask as it was whichever build fails.
TEST(MorphAdvState, InitReturnsTheFirstBuildFailure) {
  std::vector<Zel8u> mask = {0, 1, 2, 3, 4, 5};
  const std::vector<Zel8u> original = mask;
  std::vector<uint8_t> state(8192), buffer(8192);
  for (int failAt = 0; failAt < 4; ++failAt) {
    zeltest::FaultInjection faults;
    faults.failAllocationsFrom(failAt);
    EXPECT_EQ(zeliMorphAdvInit_16s_C1R({5, 5}, mask.data(), {2, 3}, reinterpret_cast<ZeliMorphAdvState*>(state.data()),
                                       buffer.data()),
              zelStatusOutOfMemory);
    EXPECT_EQ(mask, original);
    EXPECT_EQ(faults.liveBlocks(), 0);
  }
}

// ---- 1-bit images -------------------------------------------------------------
using BitOp = ZelStatus (*)(const Zel8u*, int, int, Zel8u*, int, int, ZeliSize, ZeliBorderType, Zel8u,
                            const ZeliMorphAdvState*, Zel8u*);
const BitOp kBitOps[5] = {zeliMorphOpenBorder_1u_C1R, zeliMorphCloseBorder_1u_C1R, zeliMorphTophatBorder_1u_C1R,
                          zeliMorphBlackhatBorder_1u_C1R, zeliMorphGradientBorder_1u_C1R};

int bitOf(const Zel8u* row, int i) { return (row[i >> 3] >> (7 - (i & 7))) & 1; }

// Brute force on 0/1 values: OR is max, AND is min, the difference is the
// saturating one.
struct BitReference {
  std::vector<int> src;  // (W + 2M) x (H + 2M)
  int W, H, M, border;
  const morphtest::Mask* mask;
  int cx(int x) const {
    return ((x < 0 && !morphtest::memLeft(border)) || (x >= W && !morphtest::memRight(border))) ? morphtest::clampTo(x, W) : x;
  }
  int cy(int y) const {
    return ((y < 0 && !morphtest::memTop(border)) || (y >= H && !morphtest::memBottom(border))) ? morphtest::clampTo(y, H) : y;
  }
  int s(int x, int y) const { return src[size_t(cy(y) + M) * (W + 2 * M) + size_t(cx(x) + M)]; }
  template <class F>
  int over(bool max, bool reflected, int x, int y, F f) const {
    const int ax = (mask->width - 1) / 2, ay = (mask->height - 1) / 2;
    int best = -1;
    for (int j = 0; j < mask->height; ++j)
      for (int i = 0; i < mask->width; ++i) {
        if (!mask->at(i, j)) continue;
        const int dx = reflected ? ax - i : i - ax, dy = reflected ? ay - j : j - ay;
        const int v = f(cx(x + dx), cy(y + dy));
        best = best < 0 ? v : max ? std::max(best, v) : std::min(best, v);
      }
    return best < 0 ? f(x, y) : best;
  }
  int first(bool max, int x, int y) const {
    return over(max, false, x, y, [&](int a, int b) { return s(a, b); });
  }
  int openClose(bool closing, int x, int y) const {
    return over(!closing, true, x, y, [&](int a, int b) { return first(closing, a, b); });
  }
  int at(int op, int x, int y) const {
    switch (op) {
      case 0: return openClose(false, x, y);
      case 1: return openClose(true, x, y);
      case 2: return s(x, y) & !openClose(false, x, y);
      case 3: return openClose(true, x, y) & !s(x, y);
      default: return first(true, x, y) & !first(false, x, y);
    }
  }
};

TEST(MorphAdvBits, EveryOperationMatchesTheReference) {
  std::mt19937 rng(1188);
  auto pick = [&](int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); };
  for (int round = 0; round < 120; ++round) {
    const int mw = pick(1, 7), mh = pick(1, 5);
    morphtest::Mask mask = morphtest::makeMask(rng, morphtest::randomShape(rng), mw, mh);
    const std::vector<Zel8u> original = mask.on;
    const ZeliSize initRoi = {pick(1, 70), pick(1, 12)};
    int ss, bs;
    ASSERT_EQ(zeliMorphAdvGetSize_1u_C1R(initRoi, mask.size(), &ss, &bs), zelStatusOk);
    std::vector<uint8_t> state(static_cast<size_t>(ss)), buffer(static_cast<size_t>(bs));
    auto* st = reinterpret_cast<ZeliMorphAdvState*>(state.data());
    ASSERT_EQ(zeliMorphAdvInit_1u_C1R(initRoi, mask.on.data(), mask.size(), st, buffer.data()), zelStatusOk);
    ASSERT_EQ(mask.on, original);

    const int W = pick(1, initRoi.width), H = pick(1, initRoi.height), M = std::max(mw, mh);
    const int srcOff = pick(0, 9) + M, dstOff = pick(0, 12);
    zeltest::Layout sl;
    sl.width = (srcOff + W + M + 7) / 8;
    sl.height = H + 2 * M;
    sl.padBytes = pick(0, 5);
    zeltest::TestImage<Zel8u> src(sl);
    src.fillRandom(rng, 0, 255);
    BitReference ref = {{}, W, H, M, int(morphtest::randomBorder(rng)), &mask};
    for (int y = -M; y < H + M; ++y)
      for (int x = -M; x < W + M; ++x) ref.src.push_back(bitOf(src.row(y + M), srcOff + x));
    for (int op = 0; op < 5; ++op) {
      zeltest::Layout dl;
      dl.width = (dstOff + W + 7) / 8 + pick(0, 1);
      dl.height = H;
      dl.padBytes = pick(0, 3);
      zeltest::TestImage<Zel8u> dst(dl), before(dl);
      dst.fillRandom(rng, 0, 255);
      for (int y = 0; y < H; ++y) std::memcpy(before.row(y), dst.row(y), size_t(dl.width));
      ASSERT_EQ(kBitOps[op](src.row(M), src.step(), srcOff, dst.data(), dst.step(), dstOff, {W, H},
                            ZeliBorderType(ref.border), 0x77, st, buffer.data()),
                zelStatusOk);
      ASSERT_TRUE(dst.sentinelIntact() && src.sentinelIntact());
      for (int y = 0; y < H; ++y)
        for (int i = 0; i < dl.width * 8; ++i) {
          const int x = i - dstOff;
          const int want = (x >= 0 && x < W) ? ref.at(op, x, y) : bitOf(before.row(y), i);
          ASSERT_EQ(bitOf(dst.row(y), i), want) << "op " << op << " x " << x << " y " << y << " border "
                                                << ref.border << " mask " << mw << "x" << mh;
        }
    }
  }
}

TEST(MorphAdvBits, ChecksInOrder) {
  std::vector<Zel8u> mask(6, 1);
  int ss, bs;
  ASSERT_EQ(zeliMorphAdvGetSize_1u_C1R({16, 4}, {3, 2}, &ss, &bs), zelStatusOk);
  EXPECT_EQ(ss, 2 * (16 + 80) + 32);
  std::vector<uint8_t> state(static_cast<size_t>(ss)), buffer(static_cast<size_t>(bs));
  auto* st = reinterpret_cast<ZeliMorphAdvState*>(state.data());
  ASSERT_EQ(zeliMorphAdvInit_1u_C1R({16, 4}, mask.data(), {3, 2}, st, buffer.data()), zelStatusOk);
  std::vector<Zel8u> src(64, 0x5A), dst(64, 0xC3);
  const std::vector<Zel8u> before = dst;
  for (BitOp op : kBitOps) {
    EXPECT_EQ(op(src.data(), 8, 0, nullptr, 8, 0, {0, 4}, 1, 0, st, buffer.data()), zelStatusNullPointer);
    EXPECT_EQ(op(src.data(), 8, 0, dst.data(), 8, 0, {0, 4}, 1, 0, st, buffer.data()), zelStatusBadSize);
    EXPECT_EQ(op(src.data(), 8, -1, dst.data(), 1, 0, {16, 4}, 1, 0, st, buffer.data()), zelStatusBadSize);
    EXPECT_EQ(op(src.data(), 1, 0, dst.data(), 8, 0, {16, 4}, 2, 0, st, buffer.data()), zelStatusBadStep);
    EXPECT_EQ(op(src.data(), 8, 0, dst.data(), 8, 0, {17, 4}, 2, 0, st, buffer.data()), zelStatusBadBorder);
    EXPECT_EQ(op(src.data(), 8, 0, dst.data(), 8, 0, {17, 4}, 1, 0, st, buffer.data()), zelStatusBadSize);
  }
  EXPECT_EQ(dst, before);
}

}  // namespace
