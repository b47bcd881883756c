// The derivative and smoothing filters through their exports, against the
// plain references of filters_reference.h: every member, both masks, every
// border kind and side flag, random sizes, steps and start offsets, buffers
// of exactly the reported size at odd addresses. Then the Gaussian filter
// with its state, the buffer formulas and alias groups, and GenSobelKernel.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "abi/filters_reference.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using filtref::Kernel;
using filtref::taps;
using zeltest::Layout;
using zeltest::TestImage;

// A buffer of exactly `bytes` at `offset` from a 64-byte boundary, guarded.
class Guarded {
 public:
  Guarded(int bytes, int offset) : bytes_(bytes), block_(size_t(bytes) + 256, zeltest::kSentinel) {
    data_ = reinterpret_cast<Zel8u*>((reinterpret_cast<uintptr_t>(block_.data()) + 127) & ~uintptr_t(63)) + offset;
  }
  Zel8u* data() { return data_; }
  bool intact() const {
    for (const Zel8u* p = block_.data(); p < data_; ++p)
      if (*p != zeltest::kSentinel) return false;
    for (const Zel8u* p = data_ + bytes_; p < block_.data() + block_.size(); ++p)
      if (*p != zeltest::kSentinel) return false;
    return true;
  }

 private:
  int bytes_;
  std::vector<Zel8u> block_;
  Zel8u* data_;
};

const std::vector<double> kSmooth3 = taps({1, 2, 1}), kSmooth5 = taps({1, 4, 6, 4, 1});
const std::vector<double> kFirst3 = taps({-1, 0, 1}), kFirst5 = taps({-1, -2, 0, 2, 1});
const std::vector<double> kNeg3 = taps({1, 0, -1}), kNeg5 = taps({1, 2, 0, -2, -1});
const std::vector<double> kSecond3 = taps({1, -2, 1}), kSecond5 = taps({1, 0, -2, 0, 1});
const std::vector<double> kScharr3 = taps({3, 10, 3});

enum class Out { k16s, k8s, k8u, k32f };

using Filter8u16s = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, Zel16s*, int, ZeliSize, int, ZeliBorderType, Zel8u,
                                           Zel8u*);
using Filter8u8s = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, Zel8s*, int, ZeliSize, int, ZeliBorderType, Zel8u,
                                          Zel8u*);
using Filter8u = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, Zel8u*, int, ZeliSize, int, ZeliBorderType, Zel8u,
                                        Zel8u*);
using Filter32f = ZelStatus(ZELCV_CALL*)(const Zel32f*, int, Zel32f*, int, ZeliSize, int, ZeliBorderType, Zel32f,
                                         Zel8u*);
using Query = ZelStatus(ZELCV_CALL*)(ZeliSize, int, int*);

struct Member {
  std::string name;
  Out out;
  void* filter;
  Query query;
  Kernel k3, k5;  // k5 empty: 3x3 only
  int shift3, shift5;
};

#define F(fn) reinterpret_cast<void*>(&fn)

std::vector<Member> members() {
  const Kernel horiz3{{kSmooth3, kFirst3}}, horiz5{{kSmooth5, kFirst5}};
  const Kernel vert3{{kFirst3, kSmooth3}}, vert5{{kFirst5, kSmooth5}};
  const Kernel neg3{{kNeg3, kSmooth3}}, neg5{{kNeg5, kSmooth5}};
  const Kernel hs3{{kSmooth3, kSecond3}}, hs5{{kSmooth5, kSecond5}};
  const Kernel vs3{{kSecond3, kSmooth3}}, vs5{{kSecond5, kSmooth5}};
  const Kernel cross3{{kFirst3, kFirst3}}, cross5{{kFirst5, kFirst5}};
  const Kernel sh3{{kScharr3, kFirst3}}, sv3{{kFirst3, kScharr3}};
  const Kernel lap3{{kSecond3, kSmooth3}, {kSmooth3, kSecond3}}, lap5{{kSecond5, kSmooth5}, {kSmooth5, kSecond5}};
  const Kernel box3{{taps({1, 1, 1}), taps({1, 1, 1})}}, box5{{taps({1, 1, 1, 1, 1}), taps({1, 1, 1, 1, 1})}};
  const double n9 = double(1.0f / 9), n25 = double(1.0f / 25);
  const Kernel mean3{{taps({1, 1, 1}), taps({n9, n9, n9})}};
  const Kernel mean5{{taps({1, 1, 1, 1, 1}), taps({n25, n25, n25, n25, n25})}};
  const Kernel g3{{taps({0.25, 0.5, 0.25}), taps({0.25, 0.5, 0.25})}};
  const std::vector<double> g5t = taps({0.0625, 0.25, 0.375, 0.25, 0.0625});
  const Kernel g5{{g5t, g5t}};
  return {
      {"SobelHoriz8s", Out::k8s, F(zeliFilterSobelHorizBorder_8u8s_C1R), zeliFilterSobelHorizGetBufferSize_8u8s_C1R, horiz3, horiz5, 3, 7},
      {"SobelVert8s", Out::k8s, F(zeliFilterSobelVertBorder_8u8s_C1R), zeliFilterSobelVertGetBufferSize_8u8s_C1R, vert3, vert5, 3, 7},
      {"SobelNegVert16s", Out::k16s, F(zeliFilterSobelNegVertBorder_8u16s_C1R), zeliFilterSobelNegVertGetBufferSize_8u16s_C1R, neg3, neg5, 0, 0},
      {"SobelNegVert8s", Out::k8s, F(zeliFilterSobelNegVertBorder_8u8s_C1R), zeliFilterSobelNegVertGetBufferSize_8u8s_C1R, neg3, neg5, 3, 7},
      {"SobelNegVert32f", Out::k32f, F(zeliFilterSobelNegVertBorder_32f_C1R), zeliFilterSobelNegVertGetBufferSize_32f_C1R, neg3, neg5, 0, 0},
      {"SobelHorizSecond16s", Out::k16s, F(zeliFilterSobelHorizSecondBorder_8u16s_C1R), zeliFilterSobelHorizSecondGetBufferSize_8u16s_C1R, hs3, hs5, 0, 0},
      {"SobelHorizSecond8s", Out::k8s, F(zeliFilterSobelHorizSecondBorder_8u8s_C1R), zeliFilterSobelHorizSecondGetBufferSize_8u8s_C1R, hs3, hs5, 4, 6},
      {"SobelHorizSecond32f", Out::k32f, F(zeliFilterSobelHorizSecondBorder_32f_C1R), zeliFilterSobelHorizSecondGetBufferSize_32f_C1R, hs3, hs5, 0, 0},
      {"SobelVertSecond16s", Out::k16s, F(zeliFilterSobelVertSecondBorder_8u16s_C1R), zeliFilterSobelVertSecondGetBufferSize_8u16s_C1R, vs3, vs5, 0, 0},
      {"SobelVertSecond8s", Out::k8s, F(zeliFilterSobelVertSecondBorder_8u8s_C1R), zeliFilterSobelVertSecondGetBufferSize_8u8s_C1R, vs3, vs5, 4, 6},
      {"SobelVertSecond32f", Out::k32f, F(zeliFilterSobelVertSecondBorder_32f_C1R), zeliFilterSobelVertSecondGetBufferSize_32f_C1R, vs3, vs5, 0, 0},
      {"SobelCross16s", Out::k16s, F(zeliFilterSobelCrossBorder_8u16s_C1R), zeliFilterSobelCrossGetBufferSize_8u16s_C1R, cross3, cross5, 0, 0},
      {"SobelCross8s", Out::k8s, F(zeliFilterSobelCrossBorder_8u8s_C1R), zeliFilterSobelCrossGetBufferSize_8u8s_C1R, cross3, cross5, 2, 6},
      {"SobelCross32f", Out::k32f, F(zeliFilterSobelCrossBorder_32f_C1R), zeliFilterSobelCrossGetBufferSize_32f_C1R, cross3, cross5, 0, 0},
      {"ScharrHoriz16s", Out::k16s, F(zeliFilterScharrHorizBorder_8u16s_C1R), zeliFilterScharrHorizGetBufferSize_8u16s_C1R, sh3, {}, 0, 0},
      {"ScharrHoriz8s", Out::k8s, F(zeliFilterScharrHorizBorder_8u8s_C1R), zeliFilterScharrHorizGetBufferSize_8u8s_C1R, sh3, {}, 5, 0},
      {"ScharrHoriz32f", Out::k32f, F(zeliFilterScharrHorizBorder_32f_C1R), zeliFilterScharrHorizGetBufferSize_32f_C1R, sh3, {}, 0, 0},
      {"ScharrVert16s", Out::k16s, F(zeliFilterScharrVertBorder_8u16s_C1R), zeliFilterScharrVertGetBufferSize_8u16s_C1R, sv3, {}, 0, 0},
      {"ScharrVert8s", Out::k8s, F(zeliFilterScharrVertBorder_8u8s_C1R), zeliFilterScharrVertGetBufferSize_8u8s_C1R, sv3, {}, 5, 0},
      {"ScharrVert32f", Out::k32f, F(zeliFilterScharrVertBorder_32f_C1R), zeliFilterScharrVertGetBufferSize_32f_C1R, sv3, {}, 0, 0},
      {"Laplacian16s", Out::k16s, F(zeliFilterLaplacianBorder_8u16s_C1R), zeliFilterLaplacianGetBufferSize_8u16s_C1R, lap3, lap5, 0, 0},
      {"Laplacian8s", Out::k8s, F(zeliFilterLaplacianBorder_8u8s_C1R), zeliFilterLaplacianGetBufferSize_8u8s_C1R, lap3, lap5, 4, 7},
      {"Laplacian32f", Out::k32f, F(zeliFilterLaplacianBorder_32f_C1R), zeliFilterLaplacianGetBufferSize_32f_C1R, lap3, lap5, 0, 0},
      {"Lowpass8u", Out::k8u, F(zeliFilterLowpassBorder_8u_C1R), zeliFilterLowpassGetBufferSize_8u_C1R, box3, box5, 9, 25},
      {"Lowpass32f", Out::k32f, F(zeliFilterLowpassBorder_32f_C1R), zeliFilterLowpassGetBufferSize_32f_C1R, mean3, mean5, 0, 0},
      {"Gauss32f", Out::k32f, F(zeliFilterGaussBorder_32f_C1R), zeliFilterGaussGetBufferSize_32f_C1R, g3, g5, 0, 0},
  };
}

const int kBorders[] = {zelBorderConstant,
                        zelBorderReplicate,
                        zelBorderWrap,
                        zelBorderMirror,
                        zelBorderMirrorWithEdge,
                        zelBorderInMemory,
                        zelBorderReplicate | zelBorderInMemTop | zelBorderInMemLeft,
                        zelBorderConstant | zelBorderInMemBottom | zelBorderInMemRight,
                        zelBorderMirror | zelBorderInMemTop | zelBorderInMemBottom};

constexpr int kMargin = 2;  // real pixels around every ROI, for the in-memory sides

// The source: a random image with a margin of kMargin real pixels; `roi`
// points at its ROI.
template <typename T>
struct Source {
  TestImage<T> image;
  T* roi;
  Source(std::mt19937& rng, int w, int h, int stepMultiple)
      : image(zeltest::randomLayout(rng, 1, 1, 1, stepMultiple, stepMultiple)) {
    Layout l = zeltest::randomLayout(rng, 1, 1, 1, stepMultiple, stepMultiple);
    l.width = w + 2 * kMargin;
    l.height = h + 2 * kMargin;
    image = TestImage<T>(l);
    if constexpr (std::is_floating_point<T>::value)
      image.fillRandom(rng, -300.0f, 300.0f);
    else
      image.fillRandom(rng, 0, 255);
    roi = &image.at(kMargin, kMargin);
  }
};

template <typename D>
::testing::AssertionResult checkMember(const Member& m, int mask, int border, std::mt19937& rng, int w, int h,
                                       bool stripes = false) {
  using S = typename std::conditional<std::is_same<D, Zel32f>::value, Zel32f, Zel8u>::type;
  const Kernel& kernel = mask == zelMaskSize5x5 ? m.k5 : m.k3;
  Source<S> src(rng, w, h, int(sizeof(S)));
  if (stripes)
    for (int y = -kMargin; y < h + kMargin; ++y)
      for (int x = -kMargin; x < w + kMargin; ++x)
        src.image.at(x + kMargin, y + kMargin) = S((((x + 7) / 3 + y) & 1) ? 255 : 0);
  Layout dl = zeltest::randomLayout(rng, 1, 1, 1, int(sizeof(D)), int(sizeof(D)));
  dl.width = w;
  dl.height = h;
  TestImage<D> dst(dl);
  const S value = S(std::uniform_int_distribution<int>(0, 255)(rng));
  int bytes = -1;
  if (m.query({w, h}, mask, &bytes) != zelStatusOk) return ::testing::AssertionFailure() << "query failed";
  Guarded buffer(bytes, std::uniform_int_distribution<int>(0, 15)(rng));
  ZelStatus s;
  if constexpr (std::is_same<D, Zel16s>::value)
    s = reinterpret_cast<Filter8u16s>(m.filter)(src.roi, src.image.step(), dst.data(), dst.step(), {w, h}, mask,
                                                border, value, buffer.data());
  else if constexpr (std::is_same<D, Zel8s>::value)
    s = reinterpret_cast<Filter8u8s>(m.filter)(src.roi, src.image.step(), dst.data(), dst.step(), {w, h}, mask,
                                               border, value, buffer.data());
  else if constexpr (std::is_same<D, Zel8u>::value)
    s = reinterpret_cast<Filter8u>(m.filter)(src.roi, src.image.step(), dst.data(), dst.step(), {w, h}, mask,
                                             border, value, buffer.data());
  else
    s = reinterpret_cast<Filter32f>(m.filter)(src.roi, src.image.step(), dst.data(), dst.step(), {w, h}, mask,
                                              border, value, buffer.data());
  if (s != zelStatusOk) return ::testing::AssertionFailure() << "status " << s;
  if (!dst.sentinelIntact() || !buffer.intact()) return ::testing::AssertionFailure() << "wrote outside";
  const int shift = mask == zelMaskSize5x5 ? m.shift5 : m.shift3;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      double expected;
      if constexpr (std::is_same<D, Zel32f>::value) {
        expected = filtref::floatSum(kernel, src.roi, src.image.step(), w, h, 1, x, y, 0, border, &value);
      } else {
        const int64_t v = filtref::integerSum(kernel, src.roi, src.image.step(), w, h, x, y, border, value);
        if (m.out == Out::k16s) expected = double(v);
        else if (m.out == Out::k8u) expected = double((v + shift / 2) / shift);
        else expected = double(std::min<int64_t>(127, std::max<int64_t>(-128, (v + (int64_t(1) << (shift - 1))) >> shift)));
      }
      const double got = double(dst.at(x, y));
      if (!(got == expected || (std::isnan(got) && std::isnan(expected))))
        return ::testing::AssertionFailure() << "at (" << x << ", " << y << ") of " << w << "x" << h << ": got " << got
                                             << ", expected " << expected;
    }
  return ::testing::AssertionSuccess();
}

TEST(Filters, EveryMemberMaskAndBorderAgainstTheReference) {
  std::mt19937 rng(20261125);
  for (const Member& m : members())
    for (int mask : {zelMaskSize3x3, zelMaskSize5x5}) {
      if (mask == zelMaskSize5x5 && m.k5.empty()) continue;
      for (int border : kBorders)
        for (int round = 0; round < 4; ++round) {
          const int w = std::uniform_int_distribution<int>(1, 45)(rng);
          const int h = std::uniform_int_distribution<int>(1, 9)(rng);
          SCOPED_TRACE(m.name + " mask " + std::to_string(mask) + " border " + std::to_string(border));
          switch (m.out) {
            case Out::k16s: ASSERT_TRUE(checkMember<Zel16s>(m, mask, border, rng, w, h)); break;
            case Out::k8s: ASSERT_TRUE(checkMember<Zel8s>(m, mask, border, rng, w, h)); break;
            case Out::k8u: ASSERT_TRUE(checkMember<Zel8u>(m, mask, border, rng, w, h)); break;
            case Out::k32f: ASSERT_TRUE(checkMember<Zel32f>(m, mask, border, rng, w, h)); break;
          }
        }
    }
}

// Wide rows take the vector paths end to end, including the overlapped last
// block; stripes of 0 and 255 reach the saturation of the 8s results.
TEST(Filters, WideRowsAndExtremeImages) {
  std::mt19937 rng(7);
  for (const Member& m : members())
    for (int mask : {zelMaskSize3x3, zelMaskSize5x5}) {
      if (mask == zelMaskSize5x5 && m.k5.empty()) continue;
      for (int border : {zelBorderReplicate, zelBorderMirror, zelBorderConstant})
        for (bool stripes : {false, true}) {
          SCOPED_TRACE(m.name + " mask " + std::to_string(mask) + " border " + std::to_string(border));
          const int w = 60 + int(rng() % 80), h = 1 + int(rng() % 6);
          switch (m.out) {
            case Out::k16s: ASSERT_TRUE(checkMember<Zel16s>(m, mask, border, rng, w, h, stripes)); break;
            case Out::k8s: ASSERT_TRUE(checkMember<Zel8s>(m, mask, border, rng, w, h, stripes)); break;
            case Out::k8u: ASSERT_TRUE(checkMember<Zel8u>(m, mask, border, rng, w, h, stripes)); break;
            case Out::k32f: ASSERT_TRUE(checkMember<Zel32f>(m, mask, border, rng, w, h, stripes)); break;
          }
        }
    }
}

}  // namespace
