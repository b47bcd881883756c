// The Gaussian filter with its state (8u, 16u, 32f; one and three channels;
// any odd kernel size and sigma) against the documented taps and sums; the
// buffer formulas and alias groups of the queries; the check order of every
// member; GenSobelKernel.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "abi/filters_reference.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::TestImage;

// The documented taps, written independently of the library.
std::vector<double> gaussianTaps(int k, float sigma) {
  if (!(sigma > 0) && k == 3) return {0.25, 0.5, 0.25};
  if (!(sigma > 0) && k == 5) return {0.0625, 0.25, 0.375, 0.25, 0.0625};
  if (!(sigma > 0) && k == 7) return {2 / 64.0, 7 / 64.0, 14 / 64.0, 18 / 64.0, 14 / 64.0, 7 / 64.0, 2 / 64.0};
  if (!(sigma > 0) && k == 9)
    return {4 / 256.0, 13 / 256.0, 30 / 256.0, 51 / 256.0, 60 / 256.0, 51 / 256.0, 30 / 256.0, 13 / 256.0, 4 / 256.0};
  const double s = sigma > 0 ? double(sigma) : std::fma(double(k), 0.15, 0.35);
  std::vector<double> t(static_cast<size_t>(k));
  double sum = 1.0, side = 0.0;
  for (int i = 0; i < k / 2; ++i) {
    const double x = 1 - k + 2 * i;
    side += std::exp(x * x * (-0.125 / (s * s)));
  }
  sum = side * 2.0 + 1.0;
  const double mul = 1.0 / sum;
  for (int i = 0; i < k / 2; ++i) {
    const double x = 1 - k + 2 * i;
    t[size_t(i)] = t[size_t(k - 1 - i)] = double(float(std::exp(x * x * (-0.125 / (s * s))) * mul));
  }
  t[size_t(k / 2)] = double(float(mul));
  return t;
}

template <typename T> constexpr int typeCode();
template <> constexpr int typeCode<Zel8u>() { return zel8u; }
template <> constexpr int typeCode<Zel16u>() { return zel16u; }
template <> constexpr int typeCode<Zel32f>() { return zel32f; }

template <typename T>
ZelStatus callGaussian(int ch, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int border,
                       const T* value, const ZeliFilterGaussianState* state, Zel8u* buffer) {
  if constexpr (std::is_same<T, Zel8u>::value)
    return ch == 1 ? zeliFilterGaussianBorder_8u_C1R(src, srcStep, dst, dstStep, roi, border, *value, state, buffer)
                   : zeliFilterGaussianBorder_8u_C3R(src, srcStep, dst, dstStep, roi, border, value, state, buffer);
  else if constexpr (std::is_same<T, Zel16u>::value)
    return ch == 1 ? zeliFilterGaussianBorder_16u_C1R(src, srcStep, dst, dstStep, roi, border, *value, state, buffer)
                   : zeliFilterGaussianBorder_16u_C3R(src, srcStep, dst, dstStep, roi, border, value, state, buffer);
  else
    return ch == 1 ? zeliFilterGaussianBorder_32f_C1R(src, srcStep, dst, dstStep, roi, border, *value, state, buffer)
                   : zeliFilterGaussianBorder_32f_C3R(src, srcStep, dst, dstStep, roi, border, value, state, buffer);
}

template <typename T>
void checkGaussian(std::mt19937& rng, int ch, int k, float sigma, int border) {
  const int margin = k / 2;
  const int w = 1 + int(rng() % 40), h = 1 + int(rng() % 8);
  Layout sl = zeltest::randomLayout(rng, 1, 1, ch, int(sizeof(T)), int(sizeof(T)));
  sl.width = w + 2 * margin;
  sl.height = h + 2 * margin;
  TestImage<T> src(sl);
  if constexpr (std::is_same<T, Zel32f>::value)
    src.fillRandom(rng, -1000.0f, 1000.0f);
  else
    src.fillRandom(rng, 0, std::is_same<T, Zel8u>::value ? 255 : 65535);
  Layout dl = zeltest::randomLayout(rng, 1, 1, ch, int(sizeof(T)), int(sizeof(T)));
  dl.width = w;
  dl.height = h;
  TestImage<T> dst(dl);
  int stateBytes = 0, bufferBytes = 0;
  ASSERT_EQ(zeliFilterGaussianGetBufferSize({w + int(rng() % 5), h}, k, typeCode<T>(), ch, &stateBytes, &bufferBytes),
            zelStatusOk);
  std::vector<Zel8u> state(size_t(stateBytes) + 1), buffer(size_t(bufferBytes) + 1);
  auto* gaussian = reinterpret_cast<ZeliFilterGaussianState*>(state.data() + 1);  // an odd address
  ASSERT_EQ(zeliFilterGaussianInit({w, h}, sigma, k, typeCode<T>(), ch, gaussian), zelStatusOk);
  const T value[3] = {T(17), T(200), T(3)};
  const T* roi = &src.at(margin, margin);
  ASSERT_EQ(callGaussian<T>(ch, roi, src.step(), dst.data(), dst.step(), {w, h}, border, value, gaussian,
                            buffer.data() + 1),
            zelStatusOk);
  ASSERT_TRUE(dst.sentinelIntact());
  const std::vector<double> t = gaussianTaps(k, sigma);
  const filtref::Kernel kernel{{t, t}};
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      for (int c = 0; c < ch; ++c) {
        float e = filtref::floatSum(kernel, roi, src.step(), w, h, ch, x, y, c, border, value);
        double expected = e;
        if constexpr (!std::is_same<T, Zel32f>::value) {
          const float hi = std::is_same<T, Zel8u>::value ? 255.0f : 65535.0f;
          expected = std::nearbyint(std::min(std::max(e, 0.0f), hi));
        }
        ASSERT_EQ(double(dst.at(x, y, c)), expected) << x << "," << y << "," << c << " of " << w << "x" << h;
      }
}

TEST(FiltersGaussian, EveryTypeChannelSizeAndBorder) {
  std::mt19937 rng(99);
  const int borders[] = {zelBorderConstant, zelBorderReplicate, zelBorderWrap, zelBorderMirror,
                         zelBorderMirrorWithEdge, zelBorderInMemory, zelBorderReplicate | zelBorderInMemLeft};
  for (int ch : {1, 3})
    for (int k : {3, 5, 7, 9, 11})
      for (float sigma : {0.0f, 0.7f, 1.5f, 4.0f})
        for (int border : borders) {
          SCOPED_TRACE("ch " + std::to_string(ch) + " k " + std::to_string(k) + " sigma " + std::to_string(sigma) +
                       " border " + std::to_string(border));
          checkGaussian<Zel8u>(rng, ch, k, sigma, border);
          checkGaussian<Zel16u>(rng, ch, k, sigma, border);
          checkGaussian<Zel32f>(rng, ch, k, sigma, border);
          if (HasFatalFailure()) return;
        }
}

TEST(FiltersGaussian, QueryInitAndFilterChecks) {
  int st = -1, bu = -1;
  const ZeliSize roi{64, 8};
  EXPECT_EQ(zeliFilterGaussianGetBufferSize(roi, 5, zel8u, 1, nullptr, &bu), zelStatusNullPointer);
  EXPECT_EQ(zeliFilterGaussianGetBufferSize({0, 8}, 5, zel8u, 1, &st, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliFilterGaussianGetBufferSize({0, 8}, 4, 7, 2, &st, &bu), zelStatusBadSize);
  EXPECT_EQ(zeliFilterGaussianGetBufferSize(roi, 4, zel8s, 2, &st, &bu), zelStatusBadDataType);
  EXPECT_EQ(zeliFilterGaussianGetBufferSize(roi, 4, zel16u, 2, &st, &bu), zelStatusChannelCountNotSupported);
  EXPECT_EQ(zeliFilterGaussianGetBufferSize(roi, 4, zel16u, 3, &st, &bu), zelStatusBadMaskSize);
  EXPECT_EQ(zeliFilterGaussianGetBufferSize(roi, 1, zel16u, 3, &st, &bu), zelStatusBadMaskSize);
  EXPECT_EQ(zeliFilterGaussianGetBufferSize({1 << 28, 1}, 9, zel32f, 3, &st, &bu), zelStatusBadSize);
  EXPECT_EQ(st, -1);
  EXPECT_EQ(bu, -1);
  ASSERT_EQ(zeliFilterGaussianGetBufferSize(roi, 5, zel32f, 3, &st, &bu), zelStatusOk);
  EXPECT_EQ(st, 4 * 5 + 48);
  EXPECT_EQ(bu, 3 * (4 * 5 + 8) * 64 + 8 * 3 * 4 + 24 * 5 + 128);

  std::vector<Zel8u> state(static_cast<size_t>(st)), buffer(static_cast<size_t>(bu));
  auto* gaussian = reinterpret_cast<ZeliFilterGaussianState*>(state.data());
  EXPECT_EQ(zeliFilterGaussianInit(roi, 1.0f, 5, zel32f, 3, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliFilterGaussianInit(roi, std::numeric_limits<float>::quiet_NaN(), 5, zel32f, 3, gaussian),
            zelStatusBadArgument);
  EXPECT_EQ(zeliFilterGaussianInit(roi, 1.0f, 5, zel64f, 3, gaussian), zelStatusBadDataType);

  std::vector<Zel32f> src(65 * 3 * 8, 1.0f), dst(65 * 3 * 8);
  const Zel32f value[3] = {0, 0, 0};
  const int step = 64 * 3 * 4;
  // Not initialised yet: the identifier is missing.
  std::fill(state.begin(), state.end(), Zel8u(0));
  EXPECT_EQ(zeliFilterGaussianBorder_32f_C3R(src.data(), step, dst.data(), step, roi, zelBorderReplicate, value, gaussian,
                                             buffer.data()),
            zelStatusBadContext);
  ASSERT_EQ(zeliFilterGaussianInit(roi, 1.0f, 5, zel32f, 3, gaussian), zelStatusOk);
  EXPECT_EQ(zeliFilterGaussianBorder_32f_C3R(src.data(), step, dst.data(), step, roi, zelBorderReplicate, nullptr,
                                             gaussian, buffer.data()),
            zelStatusNullPointer);
  EXPECT_EQ(zeliFilterGaussianBorder_32f_C3R(src.data(), step, dst.data(), step, {0, 8}, 5, value, nullptr,
                                             buffer.data()),
            zelStatusNullPointer);
  EXPECT_EQ(zeliFilterGaussianBorder_32f_C3R(src.data(), step, dst.data(), step, {0, 8}, 5, value, gaussian,
                                             buffer.data()),
            zelStatusBadSize);
  EXPECT_EQ(zeliFilterGaussianBorder_32f_C3R(src.data(), step - 4, dst.data(), step, roi, 5, value, gaussian,
                                             buffer.data()),
            zelStatusBadStep);
  EXPECT_EQ(zeliFilterGaussianBorder_32f_C3R(src.data(), step + 2, dst.data(), step, roi, 5, value, gaussian,
                                             buffer.data()),
            zelStatusMisalignedStep);
  EXPECT_EQ(zeliFilterGaussianBorder_32f_C3R(src.data(), step, dst.data(), step, roi, 5, value, gaussian, buffer.data()),
            zelStatusBadBorder);
  EXPECT_EQ(zeliFilterGaussianBorder_32f_C1R(src.data(), step, dst.data(), step, roi, zelBorderReplicate, 0.0f, gaussian,
                                             buffer.data()),
            zelStatusBadChannels);
  EXPECT_EQ(zeliFilterGaussianBorder_16u_C3R(reinterpret_cast<Zel16u*>(src.data()), step, reinterpret_cast<Zel16u*>(dst.data()), step, roi,
                                             zelBorderReplicate, reinterpret_cast<const Zel16u*>(value), gaussian, buffer.data()),
            zelStatusBadDataType);
  EXPECT_EQ(zeliFilterGaussianBorder_32f_C3R(src.data(), 65 * 12, dst.data(), 65 * 12, {65, 8}, zelBorderReplicate,
                                             value, gaussian, buffer.data()),
            zelStatusBadSize);
  EXPECT_TRUE(std::all_of(dst.begin(), dst.end(), [](float v) { return v == 0.0f; }));
  // A constant image stays constant: the taps sum to one within rounding.
  ASSERT_EQ(zeliFilterGaussianBorder_32f_C3R(src.data(), step, dst.data(), step, roi, zelBorderReplicate, value, gaussian,
                                             buffer.data()),
            zelStatusOk);
  for (size_t i = 0; i < 64 * 3 * 8; ++i) EXPECT_NEAR(dst[i], 1.0f, 1e-6f);
}

using Query = ZelStatus(ZELCV_CALL*)(ZeliSize, int, int*);

TEST(FiltersQueries, FormulasGroupsAndChecks) {
  const Query int8[] = {zeliFilterSobelHorizGetBufferSize_8u8s_C1R, zeliFilterSobelVertGetBufferSize_8u8s_C1R,
                        zeliFilterSobelNegVertGetBufferSize_8u16s_C1R, zeliFilterSobelNegVertGetBufferSize_8u8s_C1R,
                        zeliFilterSobelHorizSecondGetBufferSize_8u16s_C1R, zeliFilterSobelHorizSecondGetBufferSize_8u8s_C1R,
                        zeliFilterSobelVertSecondGetBufferSize_8u16s_C1R, zeliFilterSobelVertSecondGetBufferSize_8u8s_C1R,
                        zeliFilterSobelCrossGetBufferSize_8u16s_C1R, zeliFilterSobelCrossGetBufferSize_8u8s_C1R,
                        zeliFilterLaplacianGetBufferSize_8u16s_C1R, zeliFilterLaplacianGetBufferSize_8u8s_C1R,
                        zeliFilterLowpassGetBufferSize_8u_C1R};
  const Query scharr8[] = {zeliFilterScharrHorizGetBufferSize_8u16s_C1R, zeliFilterScharrHorizGetBufferSize_8u8s_C1R,
                           zeliFilterScharrVertGetBufferSize_8u16s_C1R, zeliFilterScharrVertGetBufferSize_8u8s_C1R};
  const Query float32[] = {zeliFilterSobelNegVertGetBufferSize_32f_C1R, zeliFilterSobelHorizSecondGetBufferSize_32f_C1R,
                           zeliFilterSobelVertSecondGetBufferSize_32f_C1R, zeliFilterSobelCrossGetBufferSize_32f_C1R,
                           zeliFilterLaplacianGetBufferSize_32f_C1R, zeliFilterLowpassGetBufferSize_32f_C1R,
                           zeliFilterGaussGetBufferSize_32f_C1R};
  const Query scharr32[] = {zeliFilterScharrHorizGetBufferSize_32f_C1R, zeliFilterScharrVertGetBufferSize_32f_C1R};
  auto all = [&](auto&& f) {
    for (Query q : int8) f(q, true, false);
    for (Query q : scharr8) f(q, false, false);
    for (Query q : float32) f(q, true, true);
    for (Query q : scharr32) f(q, false, true);
  };
  all([](Query q, bool has5, bool isFloat) {
    for (int w : {1, 7, 640, 1921})
      for (int mask : {zelMaskSize3x3, zelMaskSize5x5}) {
        int bytes = -1;
        if (!has5 && mask == zelMaskSize5x5) {
          EXPECT_EQ(q({w, 3}, mask, &bytes), zelStatusBadMaskSize);
          EXPECT_EQ(bytes, -1);
          continue;
        }
        ASSERT_EQ(q({w, 3}, mask, &bytes), zelStatusOk);
        const int k = mask == zelMaskSize5x5 ? 5 : 3;
        EXPECT_EQ(bytes, isFloat ? (8 * k + 8) * w + 56 * k + 120 : 5 * w + 64);
      }
    int bytes = -1;
    EXPECT_EQ(q({0, 3}, 77, nullptr), zelStatusNullPointer);
    EXPECT_EQ(q({0, 3}, 77, &bytes), zelStatusBadSize);
    EXPECT_EQ(q({3, -1}, 77, &bytes), zelStatusBadSize);
    EXPECT_EQ(q({3, 3}, 77, &bytes), zelStatusBadMaskSize);
    EXPECT_EQ(q({INT32_MAX / 8, 3}, zelMaskSize3x3, &bytes), isFloat ? zelStatusBadSize : zelStatusOk);
    EXPECT_EQ(q({INT32_MAX, 3}, zelMaskSize3x3, &bytes), zelStatusBadSize);
  });
}

using Filter8u16s = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, Zel16s*, int, ZeliSize, int, ZeliBorderType, Zel8u,
                                           Zel8u*);
using Filter32f = ZelStatus(ZELCV_CALL*)(const Zel32f*, int, Zel32f*, int, ZeliSize, int, ZeliBorderType, Zel32f,
                                         Zel8u*);

// The order of the checks, shown on one member of each kind; nothing is
// written on failure.
TEST(FiltersChecks, OrderAndCodes) {
  std::vector<Zel8u> src(16 * 8, 9), buffer(4096);
  std::vector<Zel16s> dst(16 * 8, 0);
  std::vector<Zel32f> fsrc(16 * 8, 1.0f), fdst(16 * 8, 0.0f);
  const ZeliSize roi{16, 8};
  for (Filter8u16s f : {zeliFilterSobelNegVertBorder_8u16s_C1R, zeliFilterScharrVertBorder_8u16s_C1R,
                        zeliFilterLaplacianBorder_8u16s_C1R}) {
    EXPECT_EQ(f(nullptr, 16, dst.data(), 32, {0, 8}, 0, 99, 0, buffer.data()), zelStatusNullPointer);
    EXPECT_EQ(f(src.data(), 16, dst.data(), 32, {0, 8}, 0, 99, 0, nullptr), zelStatusNullPointer);
    EXPECT_EQ(f(src.data(), 16, dst.data(), 32, {16, 0}, 0, 99, 0, buffer.data()), zelStatusBadSize);
    EXPECT_EQ(f(src.data(), 15, dst.data(), 32, roi, 0, 99, 0, buffer.data()), zelStatusBadStep);
    EXPECT_EQ(f(src.data(), 16, dst.data(), 31, roi, 0, 99, 0, buffer.data()), zelStatusBadStep);
    EXPECT_EQ(f(src.data(), 17, dst.data(), 33, roi, 0, 99, 0, buffer.data()), zelStatusMisalignedStep);
    EXPECT_EQ(f(src.data(), 17, dst.data(), 32, roi, 0, 99, 0, buffer.data()), zelStatusBadMaskSize);
    EXPECT_EQ(f(src.data(), 17, dst.data(), 32, roi, zelMaskSize3x3, 5, 0, buffer.data()), zelStatusBadBorder);
    EXPECT_EQ(f(src.data(), 17, dst.data(), 32, roi, zelMaskSize3x3, 7 | zelBorderInMemTop, 0, buffer.data()),
              zelStatusBadBorder);
    EXPECT_EQ(f(src.data(), 17, dst.data(), 32, roi, zelMaskSize3x3, 0x100, 0, buffer.data()), zelStatusBadBorder);
  }
  EXPECT_EQ(zeliFilterScharrVertBorder_8u16s_C1R(src.data(), 16, dst.data(), 32, roi, zelMaskSize5x5,
                                                 zelBorderReplicate, 0, buffer.data()),
            zelStatusBadMaskSize);
  for (Filter32f f : {zeliFilterSobelCrossBorder_32f_C1R, zeliFilterGaussBorder_32f_C1R}) {
    EXPECT_EQ(f(fsrc.data(), 64, nullptr, 64, roi, 0, 99, 0, buffer.data()), zelStatusNullPointer);
    EXPECT_EQ(f(fsrc.data(), 64, fdst.data(), 64, {-1, 8}, 0, 99, 0, buffer.data()), zelStatusBadSize);
    EXPECT_EQ(f(fsrc.data(), 60, fdst.data(), 64, roi, 0, 99, 0, buffer.data()), zelStatusBadStep);
    EXPECT_EQ(f(fsrc.data(), 64, fdst.data(), 66, roi, 0, 99, 0, buffer.data()), zelStatusMisalignedStep);
    EXPECT_EQ(f(fsrc.data(), 64, fdst.data(), 64, roi, 0, 99, 0, buffer.data()), zelStatusBadMaskSize);
    EXPECT_EQ(f(fsrc.data(), 64, fdst.data(), 64, roi, zelMaskSize5x5, 5, 0, buffer.data()), zelStatusBadBorder);
  }
  for (Zel16s v : dst) EXPECT_EQ(v, 0);
  for (Zel32f v : fdst) EXPECT_EQ(v, 0.0f);
}

TEST(FiltersGenSobel, TapsSizesAndChecks) {
  // (1 + z)^(K-1-order) (z - 1)^order, lowest power first.
  auto expected = [](int k, int order) {
    std::vector<long long> t(size_t(k), 0);
    t[0] = 1;
    for (int m = 0; m < k - 1; ++m) {
      std::vector<long long> n(size_t(k), 0);
      for (int i = 0; i <= m; ++i) {
        const long long sign = m >= k - 1 - order ? -1 : 1;  // (z - 1): -1 times z^0
        n[size_t(i)] += sign * t[size_t(i)];
        n[size_t(i + 1)] += t[size_t(i)];
      }
      t = n;
    }
    return t;
  };
  for (int k = 3; k <= 31; k += 2)
    for (int order = 0; order < k; ++order) {
      const auto e = expected(k, order);
      std::vector<Zel32f> f(static_cast<size_t>(k));
      ASSERT_EQ(zeliGenSobelKernel_32f(f.data(), k, order), zelStatusOk);
      for (int i = 0; i < k; ++i) EXPECT_EQ(f[size_t(i)], float(e[size_t(i)])) << k << " " << order;
      std::vector<Zel16s> s(size_t(k), 0);
      const ZelStatus st = zeliGenSobelKernel_16s(s.data(), k, order);
      if (k > 17) {
        EXPECT_EQ(st, zelStatusBadMaskSize);
        continue;
      }
      ASSERT_EQ(st, zelStatusOk);
      for (int i = 0; i < k; ++i) EXPECT_EQ(s[size_t(i)], e[size_t(i)]) << k << " " << order;
    }
  Zel16s t[3] = {7, 7, 7};
  EXPECT_EQ(zeliGenSobelKernel_16s(nullptr, 4, -1), zelStatusNullPointer);
  EXPECT_EQ(zeliGenSobelKernel_16s(t, 4, -1), zelStatusBadMaskSize);
  EXPECT_EQ(zeliGenSobelKernel_16s(t, 1, 0), zelStatusBadMaskSize);
  EXPECT_EQ(zeliGenSobelKernel_16s(t, 3, 3), zelStatusBadArgument);
  EXPECT_EQ(zeliGenSobelKernel_16s(t, 3, -1), zelStatusBadArgument);
  EXPECT_EQ(t[0], 7);
  ASSERT_EQ(zeliGenSobelKernel_16s(t, 3, 1), zelStatusOk);
  EXPECT_EQ(t[0], -1);
  EXPECT_EQ(t[2], 1);
}

}  // namespace
