// The Canny detector's argument checks: each code, their order, the size
// formulas, and that a failed call writes nothing.
#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <cstdint>
#include <vector>

#include "zelcv.h"

namespace {

constexpr float kNaN = NAN;

int64_t derivativeFormula(int64_t w, int64_t h) {
  const int64_t per = (w < 65533 && h < 65533) ? 5 : 9;
  return (per * h + 2 * per) * (w + 2) + 16 * w + 160;
}
int64_t borderFormula(int64_t w, int64_t h, int mask) {
  const int64_t k = mask == zelMaskSize5x5 ? 4 : 2;
  return (5 * (h + k) + 16) * (w + k) + 64;
}

TEST(CannyChecks, SizeQueriesFollowTheFormulas) {
  const ZeliSize sizes[] = {{1, 1},     {7, 3},     {640, 480},  {65532, 1}, {65533, 1},
                            {1, 65532}, {1, 65533}, {2, 70000},  {65532, 65532 / 6000}};
  for (ZeliSize s : sizes) {
    SCOPED_TRACE(testing::Message() << s.width << "x" << s.height);
    int bytes = -1;
    ASSERT_EQ(zeliCannyGetSize(s, &bytes), zelStatusOk);
    EXPECT_EQ(bytes, derivativeFormula(s.width, s.height));
    for (int mask : {zelMaskSize3x3, zelMaskSize5x5}) {
      // Filter type and norm are not examined.
      ASSERT_EQ(zeliCannyBorderGetSize(s, 12345, mask, -7, &bytes), zelStatusOk);
      EXPECT_EQ(bytes, borderFormula(s.width, s.height, mask));
    }
  }
}

TEST(CannyChecks, SizeQueryCodesAndOrder) {
  int bytes = 77;
  EXPECT_EQ(zeliCannyGetSize({0, 0}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliCannyGetSize({0, 5}, &bytes), zelStatusBadSize);
  EXPECT_EQ(zeliCannyGetSize({5, -1}, &bytes), zelStatusBadSize);
  EXPECT_EQ(zeliCannyBorderGetSize({0, 0}, 2, 1, 2, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliCannyBorderGetSize({0, 3}, 2, 1, 2, &bytes), zelStatusBadSize);  // size before mask
  EXPECT_EQ(zeliCannyBorderGetSize({3, 3}, 2, 35, 2, &bytes), zelStatusBadMaskSize);
  // Sizes whose buffer would not fit an int are refused, not wrapped.
  EXPECT_EQ(zeliCannyGetSize({30000, 30000}, &bytes), zelStatusBadSize);
  EXPECT_EQ(zeliCannyBorderGetSize({30000, 30000}, 2, zelMaskSize3x3, 2, &bytes), zelStatusBadSize);
  EXPECT_EQ(bytes, 77);
}

// Derivative entries: pointers, size, steps, step alignment, thresholds.
template <typename T>
ZelStatus callDerivative(const T* dx, int dxStep, const T* dy, int dyStep, Zel8u* dst, int dstStep, ZeliSize roi,
                         float low, float high, Zel8u* buffer);
template <>
ZelStatus callDerivative(const Zel16s* dx, int dxStep, const Zel16s* dy, int dyStep, Zel8u* dst, int dstStep,
                         ZeliSize roi, float low, float high, Zel8u* buffer) {
  return zeliCanny_16s8u_C1R(dx, dxStep, dy, dyStep, dst, dstStep, roi, low, high, buffer);
}
template <>
ZelStatus callDerivative(const Zel32f* dx, int dxStep, const Zel32f* dy, int dyStep, Zel8u* dst, int dstStep,
                         ZeliSize roi, float low, float high, Zel8u* buffer) {
  return zeliCanny_32f8u_C1R(dx, dxStep, dy, dyStep, dst, dstStep, roi, low, high, buffer);
}

template <typename T>
void derivativeChecks() {
  const int w = 6, h = 4, e = int(sizeof(T)), s = w * e;
  std::vector<T> dx(size_t(w + 2) * h, T(40)), dy(size_t(w + 2) * h, T(0));
  std::vector<Zel8u> dst(size_t(w + 2) * h, 0x3C), buffer(4096);
  const ZeliSize roi{w, h};
  Zel8u* d = dst.data();
  Zel8u* b = buffer.data();
  auto call = [&](const T* x, int xs, const T* y, int ys, Zel8u* o, int os, ZeliSize r, float lo, float hi,
                  Zel8u* buf) { return callDerivative<T>(x, xs, y, ys, o, os, r, lo, hi, buf); };
  // Pointers first, whatever else is wrong.
  EXPECT_EQ(call(nullptr, s, dy.data(), s, d, w, {0, 0}, -1, -2, b), zelStatusNullPointer);
  EXPECT_EQ(call(dx.data(), s, nullptr, s, d, w, roi, 1, 2, b), zelStatusNullPointer);
  EXPECT_EQ(call(dx.data(), s, dy.data(), s, nullptr, w, roi, 1, 2, b), zelStatusNullPointer);
  EXPECT_EQ(call(dx.data(), s, dy.data(), s, d, w, roi, 1, 2, nullptr), zelStatusNullPointer);
  // Then the size, before the steps.
  EXPECT_EQ(call(dx.data(), 0, dy.data(), 0, d, 0, {0, h}, 1, 2, b), zelStatusBadSize);
  EXPECT_EQ(call(dx.data(), s, dy.data(), s, d, w, {w, -2}, 1, 2, b), zelStatusBadSize);
  // Steps against the row bytes, before their alignment and the thresholds.
  EXPECT_EQ(call(dx.data(), s - e, dy.data(), s, d, w, roi, -1, 2, b), zelStatusBadStep);
  EXPECT_EQ(call(dx.data(), s, dy.data(), s - 1, d, w, roi, 1, 2, b), zelStatusBadStep);
  EXPECT_EQ(call(dx.data(), s, dy.data(), s, d, w - 1, roi, 1, 2, b), zelStatusBadStep);
  EXPECT_EQ(call(dx.data(), -s, dy.data(), s, d, w, roi, 1, 2, b), zelStatusBadStep);
  EXPECT_EQ(call(dx.data(), s + 1, dy.data(), s, d, w, roi, -1, 2, b), zelStatusMisalignedStep);
  EXPECT_EQ(call(dx.data(), s, dy.data(), s + e / 2, d, w, roi, 1, 2, b), zelStatusMisalignedStep);
  // Thresholds last: negative low, low above high, NaN.
  EXPECT_EQ(call(dx.data(), s, dy.data(), s, d, w + 1, roi, -0.5f, 2, b), zelStatusBadArgument);
  EXPECT_EQ(call(dx.data(), s, dy.data(), s, d, w, roi, 3, 2, b), zelStatusBadArgument);
  EXPECT_EQ(call(dx.data(), s, dy.data(), s, d, w, roi, kNaN, 2, b), zelStatusBadArgument);
  EXPECT_EQ(call(dx.data(), s, dy.data(), s, d, w, roi, 1, kNaN, b), zelStatusBadArgument);
  // Nothing was written by any failed call.
  EXPECT_EQ(dst, std::vector<Zel8u>(dst.size(), 0x3C));
  // Equal thresholds and an odd destination step are accepted.
  EXPECT_EQ(call(dx.data(), s + 2 * e, dy.data(), s, d, w + 1, roi, 2, 2, b), zelStatusOk);
  EXPECT_EQ(d[0], 255);  // the first column of a constant horizontal field
  EXPECT_EQ(d[1], 0);
}

TEST(CannyChecks, DerivativeEntries16s) { derivativeChecks<Zel16s>(); }
TEST(CannyChecks, DerivativeEntries32f) { derivativeChecks<Zel32f>(); }

TEST(CannyChecks, ImageEntryCodesAndOrder) {
  const int w = 5, h = 4;
  // A flat picture with a one-pixel margin for the in-memory sides.
  std::vector<Zel8u> src(size_t(w + 2) * (h + 2), 9), dst(size_t(w) * h, 0x3C), buffer(4096);
  const Zel8u* sp = src.data() + (w + 2) + 1;
  Zel8u* d = dst.data();
  Zel8u* b = buffer.data();
  const ZeliSize roi{w, h};
  auto call = [&](const Zel8u* in, int inStep, Zel8u* out, int outStep, ZeliSize r, int filter, int mask, int border,
                  float lo, float hi, int norm, Zel8u* buf) {
    return zeliCannyBorder_8u_C1R(in, inStep, out, outStep, r, filter, mask, border, 0, lo, hi, norm, buf);
  };
  // The mask comes first, before the pointers; Scharr has no 5x5 kernel.
  EXPECT_EQ(call(nullptr, 0, nullptr, 0, {0, 0}, 2, 34, 1, 1, 2, 2, nullptr), zelStatusBadMaskSize);
  EXPECT_EQ(call(nullptr, 0, nullptr, 0, {0, 0}, zelFilterScharr, zelMaskSize5x5, 1, 1, 2, 2, nullptr),
            zelStatusBadMaskSize);
  EXPECT_EQ(call(nullptr, w, d, w, roi, 7, zelMaskSize3x3, 9, -1, 2, 9, b), zelStatusNullPointer);
  EXPECT_EQ(call(sp, w, nullptr, w, roi, 2, zelMaskSize3x3, 1, 1, 2, 2, b), zelStatusNullPointer);
  EXPECT_EQ(call(sp, w, d, w, roi, 2, zelMaskSize3x3, 1, 1, 2, 2, nullptr), zelStatusNullPointer);
  EXPECT_EQ(call(sp, w, d, w, {w, 0}, 7, zelMaskSize3x3, 9, -1, 2, 9, b), zelStatusBadSize);
  EXPECT_EQ(call(sp, w - 1, d, w, roi, 7, zelMaskSize3x3, 9, 1, 2, 2, b), zelStatusBadStep);
  EXPECT_EQ(call(sp, w, d, 0, roi, 2, zelMaskSize3x3, 9, 1, 2, 2, b), zelStatusBadStep);
  // Filter type, norm and thresholds share -5, all before the border kind.
  EXPECT_EQ(call(sp, w, d, w, roi, 3, zelMaskSize3x3, 9, 1, 2, 2, b), zelStatusBadArgument);
  EXPECT_EQ(call(sp, w, d, w, roi, 2, zelMaskSize5x5, 9, 1, 2, 1, b), zelStatusBadArgument);
  EXPECT_EQ(call(sp, w, d, w, roi, 2, zelMaskSize3x3, 9, -1, 2, 2, b), zelStatusBadArgument);
  EXPECT_EQ(call(sp, w, d, w, roi, 5, zelMaskSize3x3, 9, 3, 2, 4, b), zelStatusBadArgument);
  EXPECT_EQ(call(sp, w, d, w, roi, 5, zelMaskSize3x3, 1, kNaN, 2, 4, b), zelStatusBadArgument);
  for (int border : {2, 3, 4, 5, 7, 0x12, 0xF3})
    EXPECT_EQ(call(sp, w, d, w, roi, 2, zelMaskSize3x3, border, 1, 2, 2, b), zelStatusBadBorder) << border;
  EXPECT_EQ(dst, std::vector<Zel8u>(dst.size(), 0x3C));
  // Only the kind is validated: side flags are accepted on kinds 0, 1 and 6.
  EXPECT_EQ(call(sp, w + 2, d, w, roi, 2, zelMaskSize3x3, 0x10 | 1, 1, 2, 2, b), zelStatusOk);
  EXPECT_EQ(dst, std::vector<Zel8u>(dst.size(), 0));  // a flat picture has no edges
  EXPECT_EQ(call(sp, w + 2, d, w, roi, 5, zelMaskSize3x3, 0xC0 | 6, 1, 1, 4, b), zelStatusOk);
  EXPECT_EQ(dst, std::vector<Zel8u>(dst.size(), 0));
  // A constant border of 0 around it makes the frame an edge.
  EXPECT_EQ(call(sp, w + 2, d, w, roi, 2, zelMaskSize3x3, zelBorderConstant, 1, 2, 2, b), zelStatusOk);
  EXPECT_EQ(d[0], 255);
  EXPECT_EQ(d[w + 1], 0);
}

}  // namespace
