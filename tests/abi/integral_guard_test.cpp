// Integral images on sources and outputs whose rows end (or begin) exactly
// at an inaccessible page, widths 1 to 70: nothing outside the rows that a
// member documents as read or written may be touched. The tilted squared
// members read the pixel just right of the ROI (documented), so their
// sources get that one pixel more.
#include <gtest/gtest.h>

#include <functional>
#include <random>
#include <string>
#include <vector>

#include "support/guard_page.h"
#include "zelcv.h"

namespace {

using zeltest::GuardedImage;
using zeltest::GuardSide;

struct Member {
  std::string name;
  int extraColumns;   // output columns beyond the ROI width (1 plain, 2 tilted)
  int sourceExtra;    // source pixels right of the ROI that the member reads
  bool floatSource;
  // src, srcStep, out1, step1, out2, step2, roi
  std::function<ZelStatus(void*, int, void*, int, void*, int, ZeliSize)> call;
  int sumBytes, sqrBytes;  // 0: no squares plane
};

std::vector<Member> members() {
  using V = void*;
  auto u8 = [](V p) { return static_cast<const Zel8u*>(p); };
  return {
      {"Integral_8u32s", 1, 0, false,
       [=](V s, int ss, V d, int ds, V, int, ZeliSize r) { return zeliIntegral_8u32s_C1R(u8(s), ss, (Zel32s*)d, ds, r, 1); }, 4, 0},
      {"Integral_8u32f", 1, 0, false,
       [=](V s, int ss, V d, int ds, V, int, ZeliSize r) { return zeliIntegral_8u32f_C1R(u8(s), ss, (Zel32f*)d, ds, r, 1); }, 4, 0},
      {"Integral_32f", 1, 0, true,
       [=](V s, int ss, V d, int ds, V, int, ZeliSize r) { return zeliIntegral_32f_C1R((const Zel32f*)s, ss, (Zel32f*)d, ds, r); }, 4, 0},
      {"SqrIntegral_8u32s", 1, 0, false,
       [=](V s, int ss, V d, int ds, V q, int qs, ZeliSize r) {
         return zeliSqrIntegral_8u32s_C1R(u8(s), ss, (Zel32s*)d, ds, (Zel32s*)q, qs, r, 0, 0);
       }, 4, 4},
      {"SqrIntegral_8u32s64f", 1, 0, false,
       [=](V s, int ss, V d, int ds, V q, int qs, ZeliSize r) {
         return zeliSqrIntegral_8u32s64f_C1R(u8(s), ss, (Zel32s*)d, ds, (Zel64f*)q, qs, r, 0, 0.0);
       }, 4, 8},
      {"SqrIntegral_8u32f64f", 1, 0, false,
       [=](V s, int ss, V d, int ds, V q, int qs, ZeliSize r) {
         return zeliSqrIntegral_8u32f64f_C1R(u8(s), ss, (Zel32f*)d, ds, (Zel64f*)q, qs, r, 0.0f, 0.0);
       }, 4, 8},
      {"TiltedIntegral_8u32f", 2, 0, false,
       [=](V s, int ss, V d, int ds, V, int, ZeliSize r) { return zeliTiltedIntegral_8u32f_C1R(u8(s), ss, (Zel32f*)d, ds, r, 0); }, 4, 0},
      {"TiltedIntegral_8u32s", 2, 0, false,
       [=](V s, int ss, V d, int ds, V, int, ZeliSize r) { return zeliTiltedIntegral_8u32s_C1R(u8(s), ss, (Zel32s*)d, ds, r, 0); }, 4, 0},
      {"TiltedSqrIntegral_8u32s", 2, 1, false,
       [=](V s, int ss, V d, int ds, V q, int qs, ZeliSize r) {
         return zeliTiltedSqrIntegral_8u32s_C1R(u8(s), ss, (Zel32s*)d, ds, (Zel32s*)q, qs, r, 0, 0);
       }, 4, 4},
      {"TiltedSqrIntegral_8u32s64f", 2, 1, false,
       [=](V s, int ss, V d, int ds, V q, int qs, ZeliSize r) {
         return zeliTiltedSqrIntegral_8u32s64f_C1R(u8(s), ss, (Zel32s*)d, ds, (Zel64f*)q, qs, r, 0, 0.0);
       }, 4, 8},
      {"TiltedSqrIntegral_8u32f64f", 2, 1, false,
       [=](V s, int ss, V d, int ds, V q, int qs, ZeliSize r) {
         return zeliTiltedSqrIntegral_8u32f64f_C1R(u8(s), ss, (Zel32f*)d, ds, (Zel64f*)q, qs, r, 0.0f, 0.0);
       }, 4, 8},
  };
}

TEST(IntegralGuard, TouchesNothingOutsideTheRows) {
  std::mt19937 rng(4242);
  for (const Member& m : members()) {
    SCOPED_TRACE(m.name);
    for (GuardSide side : {GuardSide::After, GuardSide::Before})
      for (int width = 1; width <= 70; ++width) {
        const int height = 1 + width % 4, outHeight = height + m.extraColumns;
        const int srcBytes = m.floatSource ? 4 : 1;
        // Every row of every image at its own guard page.
        GuardedImage<uint8_t> src((width + m.sourceExtra) * srcBytes, height, 1, side, 0, true);
        GuardedImage<uint8_t> sums((width + m.extraColumns) * m.sumBytes, outHeight, 1, side, 0, true);
        GuardedImage<uint8_t> sqr((width + m.extraColumns) * (m.sqrBytes ? m.sqrBytes : 1), outHeight, 1, side, 0,
                                  true);
        ASSERT_TRUE(src.ok() && sums.ok() && sqr.ok());
        for (int y = 0; y < height; ++y)
          for (int i = 0; i < (width + m.sourceExtra) * srcBytes; ++i)
            src.row(y)[i] = uint8_t(m.floatSource ? (i % 4 == 3 ? 0x3F : rng()) : rng());
        ASSERT_EQ(m.call(src.data(), src.step(), sums.data(), sums.step(), sqr.data(), sqr.step(), {width, height}),
                  zelStatusOk)
            << "width " << width;
      }
  }
}

}  // namespace
