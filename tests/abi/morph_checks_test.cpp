// Argument checks of the flat-morphology processing calls: the first failing
// check in the family's order decides the code, and nothing is written.
#include <gtest/gtest.h>

#include <vector>

#include "zelcv.h"

namespace {

// A 3 x 3 element, states for ROI width 8, images of 8 x 4 pixels with room
// for four channels of 32f, and a destination that must stay untouched.
struct Fixture {
  Zel8u mask[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};
  std::vector<Zel8u> state8u, state16u, state1u, older8u, buffer;
  std::vector<Zel8u> src = std::vector<Zel8u>(4096, 1), dst = std::vector<Zel8u>(4096, 0xEE);
  Fixture() {
    int s = 0, b = 0;
    zeliMorphologyBorderGetSize_8u_C1R(8, {3, 3}, &s, &b);
    state8u.resize(size_t(s));
    buffer.resize(size_t(b) * 8);
    zeliMorphologyBorderInit_8u_C1R(8, mask, {3, 3}, st(state8u), nullptr);
    zeliMorphologyBorderGetSize_16u_C1R(8, {3, 3}, &s, &b);
    state16u.resize(size_t(s));
    zeliMorphologyBorderInit_16u_C1R(8, mask, {3, 3}, st(state16u), nullptr);
    zeliMorphologyBorderGetSize_1u_C1R(8, {3, 3}, &s, &b);
    state1u.resize(size_t(s));
    zeliMorphologyBorderInit_1u_C1R(8, mask, {3, 3}, st(state1u), nullptr);
    zeliMorphologyGetSize_8u_C1R(8, mask, {3, 3}, &s);
    older8u.resize(size_t(s));
    zeliMorphologyInit_8u_C1R(8, mask, {3, 3}, {1, 1}, st(older8u));
  }
  static ZeliMorphState* st(std::vector<Zel8u>& v) { return reinterpret_cast<ZeliMorphState*>(v.data()); }
  bool untouched() const {
    for (Zel8u v : dst)
      if (v != 0xEE) return false;
    return true;
  }
  const Zel16u* src16() const { return reinterpret_cast<const Zel16u*>(src.data()); }
  Zel16u* dst16() { return reinterpret_cast<Zel16u*>(dst.data()); }
  const Zel32f* src32() const { return reinterpret_cast<const Zel32f*>(src.data()); }
  Zel32f* dst32() { return reinterpret_cast<Zel32f*>(dst.data()); }
};

TEST(MorphChecks, FilterOrderPutsTheAnchorBeforeTheSteps) {
  Fixture t;
  Zel8u* b = t.buffer.data();
  const ZeliSize roi = {8, 4};
  EXPECT_EQ(zeliFilterMaxBorderReplicate_8u_C1R(nullptr, 8, t.dst.data(), 8, {0, 0}, {3, 3}, {1, 1}, b), -8);
  EXPECT_EQ(zeliFilterMinBorderReplicate_8u_C3R(t.src.data(), 24, t.dst.data(), 24, roi, {3, 3}, {1, 1}, nullptr), -8);
  EXPECT_EQ(zeliFilterMaxBorderReplicate_8u_C4R(t.src.data(), 1, t.dst.data(), 32, {8, 0}, {0, 3}, {1, 1}, b), -6);
  EXPECT_EQ(zeliFilterMaxBorderReplicate_8u_C1R(t.src.data(), 1, t.dst.data(), 8, roi, {3, 0}, {9, 9}, b), -33);
  EXPECT_EQ(zeliFilterMinBorderReplicate_8u_C1R(t.src.data(), 1, t.dst.data(), 1, roi, {3, 3}, {3, 1}, b), -34);
  EXPECT_EQ(zeliFilterMinBorderReplicate_8u_C1R(t.src.data(), 1, t.dst.data(), 1, roi, {3, 3}, {1, -1}, b), -34);
  EXPECT_EQ(zeliFilterMaxBorderReplicate_8u_C3R(t.src.data(), 23, t.dst.data(), 24, roi, {3, 3}, {1, 1}, b), -14);
  EXPECT_EQ(zeliFilterMaxBorderReplicate_8u_C1R(t.src.data(), 9, t.dst.data(), 7, roi, {3, 3}, {1, 1}, b), -14);
  // 32f: the source's size and alignment first, then the destination's.
  EXPECT_EQ(zeliFilterMaxBorderReplicate_32f_C1R(t.src32(), 34, t.dst32(), 4, roi, {3, 3}, {1, 1}, b), -108);
  EXPECT_EQ(zeliFilterMaxBorderReplicate_32f_C1R(t.src32(), 32, t.dst32(), 4, roi, {3, 3}, {1, 1}, b), -14);
  EXPECT_EQ(zeliFilterMinBorderReplicate_32f_C3R(t.src32(), 96, t.dst32(), 98, roi, {3, 3}, {1, 1}, b), -108);
  EXPECT_EQ(zeliFilterMinBorderReplicate_32f_C4R(t.src32(), 126, t.dst32(), 128, roi, {3, 3}, {1, 1}, b), -14);
  EXPECT_TRUE(t.untouched());
}

TEST(MorphChecks, BorderOrderAndCodes) {
  Fixture t;
  const ZeliMorphState* st = Fixture::st(t.state8u);
  Zel8u* b = t.buffer.data();
  const ZeliSize roi = {8, 4};
  EXPECT_EQ(zeliDilateBorder_8u_C1R(t.src.data(), 8, t.dst.data(), 8, {0, 0}, 1, 0, nullptr, b), -8);
  EXPECT_EQ(zeliErodeBorder_8u_C1R(t.src.data(), 8, t.dst.data(), 8, roi, 1, 0, st, nullptr), -8);
  EXPECT_EQ(zeliDilateBorder_8u_C1R(t.src.data(), 8, t.dst.data(), 8, {8, 0}, 1, 0, st, b), -6);
  EXPECT_EQ(zeliDilateBorder_8u_C1R(t.src.data(), 7, t.dst.data(), 8, roi, 9, 0, st, b), -14);
  EXPECT_EQ(zeliErodeBorder_8u_C1R(t.src.data(), 8, t.dst.data(), -8, roi, 9, 0, st, b), -14);
  for (int border : {0, 2, 3, 4, 5, 7, 15, 0x10, 0xF0, 0x43}) {
    SCOPED_TRACE(border);
    EXPECT_EQ(zeliDilateBorder_8u_C1R(t.src.data(), 8, t.dst.data(), 8, roi, border, 0, st, b), -225);
  }
  // A ROI wider than the state was built for.
  EXPECT_EQ(zeliDilateBorder_8u_C1R(t.src.data(), 9, t.dst.data(), 9, {9, 4}, 1, 0, st, b), -6);
  EXPECT_EQ(zeliDilateBorder_8u_C1R(t.src.data(), 9, t.dst.data(), 9, {9, 4}, 0, 0, st, b), -225);
  // A state of another element type or channel count.
  EXPECT_EQ(zeliDilateBorder_32f_C1R(t.src32(), 32, t.dst32(), 32, roi, 1, 0, st, b), zelStatusBadDataType);
  EXPECT_EQ(zeliDilateBorder_8u_C3R(t.src.data(), 24, t.dst.data(), 24, roi, 1, nullptr, st, b), zelStatusBadChannels);
  // 16-bit: odd steps, then the width, then in place.
  const ZeliMorphState* st16 = Fixture::st(t.state16u);
  EXPECT_EQ(zeliDilateBorder_16u_C1R(t.src16(), 15, t.dst16(), 16, roi, 1, 0, st16, b), -14);
  EXPECT_EQ(zeliDilateBorder_16u_C1R(t.src16(), 17, t.dst16(), 16, roi, 1, 0, st16, b), -108);
  EXPECT_EQ(zeliErodeBorder_16s_C1R((const Zel16s*)t.src16(), 16, (Zel16s*)t.dst16(), 19, roi, 1, 0, st16, b), -108);
  EXPECT_EQ(zeliErodeBorder_16u_C1R(t.src16(), 16, t.dst16(), 16, roi, 2, 0, st16, b), -225);
  EXPECT_EQ(zeliErodeBorder_16u_C1R(t.dst16(), 18, t.dst16(), 18, {9, 4}, 1, 0, st16, b), -6);
  EXPECT_EQ(zeliErodeBorder_16u_C1R(t.dst16(), 16, t.dst16(), 16, roi, 1, 0, st16, b), -9997);
  EXPECT_TRUE(t.untouched());
}

TEST(MorphChecks, ReplicateInterfaceTakesBorderOneOnly) {
  Fixture t;
  ZeliMorphState* st = Fixture::st(t.older8u);
  const ZeliSize roi = {8, 4};
  EXPECT_EQ(zeliDilateBorderReplicate_8u_C1R(t.src.data(), 8, t.dst.data(), 8, {0, 4}, 1, nullptr), -8);
  EXPECT_EQ(zeliDilateBorderReplicate_8u_C1R(t.src.data(), 8, t.dst.data(), 8, {0, 4}, 1, st), -6);
  EXPECT_EQ(zeliErodeBorderReplicate_8u_C1R(t.src.data(), 7, t.dst.data(), 8, roi, 6, st), -14);
  for (int border : {0, 2, 6, 1 | 0x10, 1 | 0xF0, 0x21}) {
    SCOPED_TRACE(border);
    EXPECT_EQ(zeliDilateBorderReplicate_8u_C1R(t.src.data(), 8, t.dst.data(), 8, roi, border, st), -5);
  }
  EXPECT_EQ(zeliErodeBorderReplicate_8u_C1R(t.src.data(), 9, t.dst.data(), 9, {9, 4}, 1, st), -6);
  EXPECT_TRUE(t.untouched());
  EXPECT_EQ(zeliErodeBorderReplicate_8u_C1R(t.src.data(), 8, t.dst.data(), 8, roi, 1, st), 0);
}

TEST(MorphChecks, BitImages) {
  Fixture t;
  const ZeliMorphState* st = Fixture::st(t.state1u);
  Zel8u* b = t.buffer.data();
  const ZeliSize roi = {8, 4};
  EXPECT_EQ(zeliDilateBorder_1u_C1R(t.src.data(), 1, 0, t.dst.data(), 1, 0, roi, 1, 0, st, nullptr), -8);
  EXPECT_EQ(zeliDilateBorder_1u_C1R(t.src.data(), 1, 0, t.dst.data(), 1, 0, {8, 0}, 1, 0, st, b), -6);
  EXPECT_EQ(zeliDilateBorder_1u_C1R(t.src.data(), 0, -1, t.dst.data(), 1, 0, roi, 1, 0, st, b), -6);
  EXPECT_EQ(zeliErodeBorder_1u_C1R(t.src.data(), 0, 0, t.dst.data(), 1, -3, roi, 1, 0, st, b), -6);
  EXPECT_EQ(zeliErodeBorder_1u_C1R(t.src.data(), 0, 0, t.dst.data(), 1, 0, roi, 1, 0, st, b), -14);
  EXPECT_EQ(zeliErodeBorder_1u_C1R(t.src.data(), 1, 0, t.dst.data(), 1, 0, roi, 5, 0, st, b), -225);
  EXPECT_EQ(zeliErodeBorder_1u_C1R(t.src.data(), 2, 0, t.dst.data(), 2, 0, {9, 4}, 1, 0, st, b), -6);
  EXPECT_EQ(zeliErodeBorder_1u_C1R(t.dst.data(), 1, 0, t.dst.data(), 1, 3, roi, 1, 0, st, b), -9997);
  EXPECT_TRUE(t.untouched());
}

}  // namespace
