// Pyramid layer states against a reference that filters the whole image and
// resamples it, over rates, kernel sizes, random sizes, steps and offsets;
// the chain of level sizes; checks; allocation failures.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <type_traits>
#include <vector>

#include "support/fault_injection.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::TestImage;

int reflect(int i, int n) {
  if (n == 1) return 0;
  while (i < 0 || i >= n) i = i < 0 ? -i : 2 * (n - 1) - i;
  return i;
}

template <typename T>
using Tap = typename std::conditional<std::is_same<T, float>::value, Zel32f, Zel16s>::type;

// The taps as the layer applies them: normalised, mirrored from the first half.
template <typename T>
std::vector<float> appliedTaps(const std::vector<Tap<T>>& k) {
  const int n = int(k.size());
  std::vector<float> t(n);
  if constexpr (std::is_same<T, float>::value) {
    float sum = 0;
    for (float v : k) sum += v;
    if (sum == 0) sum = 1;
    for (int i = 0; i < n; ++i) t[i] = k[std::min(i, n - 1 - i)] / sum;
  } else {
    long long sum = 0;
    for (int v : k) sum += v;
    if (sum == 0) sum = 1;
    const int shift = std::is_same<T, Zel8u>::value ? 1 : 2;
    for (int i = 0; i < n; ++i) {
      const long long q = (long long)k[std::min(i, n - 1 - i)] * 16384 / sum;
      t[i] = float(q >> shift) / float(1 << (14 - shift));
    }
  }
  return t;
}

template <typename T>
T convert(float v) {
  if constexpr (std::is_same<T, float>::value) {
    return v;
  } else {
    const float f = v + 0.5f;
    if (!(f > 0)) return 0;
    return f >= float(std::numeric_limits<T>::max()) ? std::numeric_limits<T>::max() : T(int(f));
  }
}

struct Pos {
  int a, b;
  float f;
};
Pos position(int x, int n, float rate, bool down) {
  if (down && std::fabs(rate - 2.0f) <= 0.00002f) return {std::min(2 * x, n - 1), std::min(2 * x, n - 1), 0.0f};
  float p = down ? float(x) * rate : float(x) / rate;
  p = std::min(p, float(n - 1));
  const int i = int(p);
  return {i, std::min(i + 1, n - 1), p - float(i)};
}

// Filters the whole image, then samples it.
template <typename T>
std::vector<T> referenceLayer(const TestImage<T>& src, int dw, int dh, const std::vector<float>& taps, float rate,
                              bool down) {
  const int w = src.width(), h = src.height(), ch = src.channels(), K = int(taps.size()), R = K / 2;
  std::vector<float> hor(size_t(w) * h * ch), fil(size_t(w) * h * ch);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      for (int c = 0; c < ch; ++c) {
        float acc = taps[0] * float(src.at(reflect(x - R, w), y, c));
        for (int k = 1; k < K; ++k) acc += taps[k] * float(src.at(reflect(x - R + k, w), y, c));
        hor[(size_t(y) * w + x) * ch + c] = acc;
      }
  for (int y = 0; y < h; ++y)
    for (int i = 0; i < w * ch; ++i) {
      float acc = taps[0] * hor[size_t(reflect(y - R, h)) * w * ch + i];
      for (int k = 1; k < K; ++k) acc += taps[k] * hor[size_t(reflect(y - R + k, h)) * w * ch + i];
      fil[size_t(y) * w * ch + i] = acc;
    }
  auto F = [&](int x, int y, int c) { return fil[(size_t(y) * w + x) * ch + c]; };
  const bool exact = down && std::fabs(rate - 2.0f) <= 0.00002f;
  std::vector<T> out(size_t(dw) * dh * ch);
  for (int y = 0; y < dh; ++y) {
    const Pos py = position(y, h, rate, down);
    for (int x = 0; x < dw; ++x) {
      const Pos px = position(x, w, rate, down);
      for (int c = 0; c < ch; ++c) {
        float v;
        if (exact) {
          v = F(px.a, py.a, c);
        } else {
          const float v0 = F(px.a, py.a, c) + (F(px.b, py.a, c) - F(px.a, py.a, c)) * px.f;
          const float v1 = F(px.a, py.b, c) + (F(px.b, py.b, c) - F(px.a, py.b, c)) * px.f;
          v = v0 + (v1 - v0) * py.f;
        }
        out[(size_t(y) * dw + x) * ch + c] = convert<T>(v);
      }
    }
  }
  return out;
}

template <typename T>
struct LayerFns {
  ZelStatus (*initDown)(ZeliPyramidLayerState**, ZeliSize, Zel32f, const Tap<T>*, int, int);
  ZelStatus (*initUp)(ZeliPyramidLayerState**, ZeliSize, Zel32f, const Tap<T>*, int, int);
  ZelStatus (*down)(const T*, int, ZeliSize, T*, int, ZeliSize, ZeliPyramidLayerState*);
  ZelStatus (*up)(const T*, int, ZeliSize, T*, int, ZeliSize, ZeliPyramidLayerState*);
  ZelStatus (*freeDown)(ZeliPyramidLayerState*);
  ZelStatus (*freeUp)(ZeliPyramidLayerState*);
};
#define ZELTEST_LAYER_FNS(s)                                                                               \
  {                                                                                                        \
    zeliPyramidLayerDownInitAlloc_##s, zeliPyramidLayerUpInitAlloc_##s, zeliPyramidLayerDown_##s,          \
        zeliPyramidLayerUp_##s, zeliPyramidLayerDownFree_##s, zeliPyramidLayerUpFree_##s                   \
  }

template <typename T>
void fill(TestImage<T>& im, std::mt19937& rng) {
  if constexpr (std::is_same<T, float>::value)
    im.fillRandom(rng, -100.0f, 100.0f);
  else
    im.fillRandom(rng, 0, int(std::numeric_limits<T>::max()));
}

template <typename T>
void compareLayers(const LayerFns<T>& fn, int channels, uint32_t seed) {
  std::mt19937 rng(seed);
  const float rates[] = {2.0f, 1.5f, 2.00001f, 3.7f, 1.1f, 10.0f};
  for (int trial = 0; trial < 40; ++trial) {
    const float rate = rates[trial % 6];
    // The last trials take kernels longer than the ring of filtered rows.
    const int K = trial < 36 ? 3 + 2 * (trial / 6 % 3) : 67;
    std::vector<Tap<T>> kernel(K);
    for (auto& k : kernel) k = Tap<T>(std::uniform_int_distribution<int>(-20, 200)(rng));
    if (trial % 4 == 0) kernel[K - 1] = Tap<T>(kernel[K - 1] + 7);  // not symmetric: the first half rules
    const int step = int(sizeof(T));
    Layout l = zeltest::randomLayout(rng, trial < 6 ? 4 : 50, trial < 6 ? 4 : 30, channels, step, step);
    TestImage<T> src(l);
    fill(src, rng);
    const bool down = trial % 2 == 0;
    ZeliSize dsz;
    if (down) {
      ASSERT_EQ(zeliGetPyramidDownROI(src.size(), &dsz, rate), zelStatusOk);
    } else {
      ZeliSize lo, hi;
      ASSERT_EQ(zeliGetPyramidUpROI(src.size(), &lo, &hi, rate), zelStatusOk);
      dsz = {std::uniform_int_distribution<int>(lo.width, hi.width)(rng),
             std::uniform_int_distribution<int>(lo.height, hi.height)(rng)};
    }
    SCOPED_TRACE(testing::Message() << (down ? "down " : "up ") << l.width << "x" << l.height << " -> " << dsz.width
                                    << "x" << dsz.height << " C" << channels << " rate " << rate << " K " << K);
    Layout o = zeltest::randomLayout(rng, 1, 1, channels, step, step);
    o.width = dsz.width;
    o.height = dsz.height;
    TestImage<T> dst(o);
    ZeliPyramidLayerState* st = nullptr;
    ASSERT_EQ((down ? fn.initDown : fn.initUp)(&st, src.size(), rate, kernel.data(), K, 2), zelStatusOk);
    ASSERT_EQ((down ? fn.down : fn.up)(src.data(), src.step(), src.size(), dst.data(), dst.step(), dsz, st),
              zelStatusOk);
    EXPECT_EQ((down ? fn.freeDown : fn.freeUp)(st), zelStatusOk);
    const std::vector<T> want = referenceLayer(src, dsz.width, dsz.height, appliedTaps<T>(kernel), rate, down);
    for (int y = 0; y < dsz.height; ++y)
      ASSERT_EQ(std::memcmp(dst.row(y), &want[size_t(y) * dsz.width * channels], sizeof(T) * dsz.width * channels),
                0)
          << "row " << y;
    ASSERT_TRUE(dst.sentinelIntact());
  }
}

TEST(PyramidLayer, MatchesReference) {
  compareLayers<Zel8u>(ZELTEST_LAYER_FNS(8u_C1R), 1, 21);
  compareLayers<Zel8u>(ZELTEST_LAYER_FNS(8u_C3R), 3, 22);
  compareLayers<Zel16u>(ZELTEST_LAYER_FNS(16u_C1R), 1, 23);
  compareLayers<Zel16u>(ZELTEST_LAYER_FNS(16u_C3R), 3, 24);
  compareLayers<Zel32f>(ZELTEST_LAYER_FNS(32f_C1R), 1, 25);
  compareLayers<Zel32f>(ZELTEST_LAYER_FNS(32f_C3R), 3, 26);
}

// Halving 8u images: kernels whose sums stay integral (the binomial ones in
// any scale, others within 16-bit taps) and kernels that do not, rows wide
// enough for the vector steps, images below three rows or columns, and
// sources narrower than the state's base, whose destination comes from the
// chain rather than from halving.
TEST(PyramidLayer, HalvingEightBitMatchesReference) {
  const std::vector<std::vector<Zel16s>> kernels = {
      {1, 4, 6, 4, 1}, {3, 12, 18, 12, 3}, {1, 4, 6, 5, 9}, {1, 2, 1},       {2, 7, 12, 20, 12, 7, 2},
      {1, 4, 7, 4, 1}, {-3, 10, 40, 10, -3}, {200, -199, 3, -199, 200}, {9, 30000, 9}};
  std::mt19937 rng(31);
  for (int trial = 0; trial < 120; ++trial) {
    const std::vector<Zel16s>& kernel = kernels[trial % kernels.size()];
    const int channels = trial % 4 == 3 ? 3 : 1;
    const int K = int(kernel.size());
    Layout l = zeltest::randomLayout(rng, trial % 5 == 0 ? 4 : 300, trial % 5 == 0 ? 4 : 24, channels, 1, 1);
    TestImage<Zel8u> src(l);
    fill(src, rng);
    // A third of the states are built for a wider base of the same height.
    const ZeliSize base = {l.width + (trial % 3 == 0 ? int(rng() % 20) : 0), l.height};
    ZeliSize dsz;
    ZeliPyramidLayerState* st = nullptr;
    ASSERT_EQ(zeliGetPyramidDownROI(base, &dsz, 2.0f), zelStatusOk);
    SCOPED_TRACE(testing::Message() << l.width << "x" << l.height << " base " << base.width << " C" << channels
                                    << " kernel " << trial % kernels.size());
    Layout o = zeltest::randomLayout(rng, 1, 1, channels, 1, 1);
    o.width = dsz.width;
    o.height = dsz.height;
    TestImage<Zel8u> dst(o);
    auto init = channels == 1 ? zeliPyramidLayerDownInitAlloc_8u_C1R : zeliPyramidLayerDownInitAlloc_8u_C3R;
    auto down = channels == 1 ? zeliPyramidLayerDown_8u_C1R : zeliPyramidLayerDown_8u_C3R;
    ASSERT_EQ(init(&st, base, 2.0f, kernel.data(), K, 2), zelStatusOk);
    ASSERT_EQ(down(src.data(), src.step(), src.size(), dst.data(), dst.step(), dsz, st), zelStatusOk);
    EXPECT_EQ(zeliPyramidLayerDownFree_8u_C1R(st), zelStatusOk);
    const std::vector<Zel8u> want = referenceLayer(src, dsz.width, dsz.height, appliedTaps<Zel8u>(kernel), 2.0f, true);
    for (int y = 0; y < dsz.height; ++y)
      ASSERT_EQ(std::memcmp(dst.row(y), &want[size_t(y) * dsz.width * channels], size_t(dsz.width) * channels), 0)
          << "row " << y;
    ASSERT_TRUE(dst.sentinelIntact());
    // The binomial taps give the 5x5 reduction's results.
    if (trial % kernels.size() < 2 && l.width >= 3 && l.height >= 3 && base.width == l.width) {
      int bytes = 0;
      ASSERT_EQ(zeliPyrDownGetBufSize_Gauss5x5(l.width, 1, channels, &bytes), zelStatusOk);
      std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
      std::vector<Zel8u> gauss(size_t(dsz.width) * dsz.height * channels);
      const int gStep = dsz.width * channels;
      ASSERT_EQ((channels == 1 ? zeliPyrDown_Gauss5x5_8u_C1R : zeliPyrDown_Gauss5x5_8u_C3R)(
                    src.data(), src.step(), gauss.data(), gStep, src.size(), buffer.data()),
                zelStatusOk);
      EXPECT_EQ(gauss, want);
    }
  }
}

// A normalised kernel keeps a flat image flat, at rate 2 and elsewhere.
TEST(PyramidLayer, FlatImageStaysFlat) {
  const Zel16s kernel[5] = {1, 4, 6, 4, 1};
  std::vector<Zel8u> src(40 * 30, 200), dst(40 * 30, 0);
  for (float rate : {2.0f, 1.7f}) {
    ZeliPyramidLayerState* st = nullptr;
    ASSERT_EQ(zeliPyramidLayerDownInitAlloc_8u_C1R(&st, {40, 30}, rate, kernel, 5, 2), zelStatusOk);
    ZeliSize d;
    ASSERT_EQ(zeliGetPyramidDownROI({40, 30}, &d, rate), zelStatusOk);
    ASSERT_EQ(zeliPyramidLayerDown_8u_C1R(src.data(), 40, {40, 30}, dst.data(), 40, d, st), zelStatusOk);
    for (int i = 0; i < d.height; ++i)
      for (int x = 0; x < d.width; ++x) ASSERT_EQ(dst[i * 40 + x], 200);
    EXPECT_EQ(zeliPyramidLayerDownFree_8u_C1R(st), zelStatusOk);
  }
}

// The destination size follows the chain of the state's base: the first
// entry with the source's height decides, whatever the source's width.
TEST(PyramidLayer, DestinationSizeFollowsTheChain) {
  const Zel32f kernel[3] = {1, 2, 1};
  ZeliPyramidLayerState* st = nullptr;
  ASSERT_EQ(zeliPyramidLayerDownInitAlloc_32f_C1R(&st, {100, 60}, 2.0f, kernel, 3, 2), zelStatusOk);
  std::vector<Zel32f> src(100 * 60), dst(100 * 60);
  ZeliSize next;
  ASSERT_EQ(zeliGetPyramidDownROI({100, 60}, &next, 2.0f), zelStatusOk);
  EXPECT_EQ(zeliPyramidLayerDown_32f_C1R(src.data(), 400, {100, 60}, dst.data(), 400, next, st), zelStatusOk);
  // Height 60 is in the chain: a narrower source still needs the chain's next size.
  EXPECT_EQ(zeliPyramidLayerDown_32f_C1R(src.data(), 400, {41, 60}, dst.data(), 400, {21, 30}, st),
            zelStatusBadSize);
  EXPECT_EQ(zeliPyramidLayerDown_32f_C1R(src.data(), 400, {41, 60}, dst.data(), 400, next, st), zelStatusOk);
  // Height 59 is not: the down size of the source itself.
  EXPECT_EQ(zeliPyramidLayerDown_32f_C1R(src.data(), 400, {41, 59}, dst.data(), 400, {21, 30}, st), zelStatusOk);
  EXPECT_EQ(zeliPyramidLayerDown_32f_C1R(src.data(), 400, {41, 59}, dst.data(), 400, {20, 30}, st),
            zelStatusBadSize);
  // Wider than the base.
  EXPECT_EQ(zeliPyramidLayerDown_32f_C1R(src.data(), 404, {101, 59}, dst.data(), 400, {51, 30}, st),
            zelStatusBadSize);
  EXPECT_EQ(zeliPyramidLayerDownFree_32f_C3R(st), zelStatusOk);
}

TEST(PyramidLayer, ChecksInOrder) {
  const Zel16s k[5] = {1, 4, 6, 4, 1};
  ZeliPyramidLayerState* st = reinterpret_cast<ZeliPyramidLayerState*>(&st);
  ZeliPyramidLayerState* const sentinel = st;
  EXPECT_EQ(zeliPyramidLayerDownInitAlloc_16u_C1R(nullptr, {0, 4}, 0.0f, k, 4, 1), zelStatusNullPointer);
  EXPECT_EQ(zeliPyramidLayerDownInitAlloc_16u_C1R(&st, {4, 4}, 2.0f, nullptr, 5, 2), zelStatusNullPointer);
  EXPECT_EQ(zeliPyramidLayerDownInitAlloc_16u_C1R(&st, {0, 4}, 0.0f, k, 4, 1), zelStatusBadSize);
  EXPECT_EQ(zeliPyramidLayerUpInitAlloc_16u_C1R(&st, {4, 4}, 0.0f, k, 4, 1), zelStatusBadArgument);
  EXPECT_EQ(zeliPyramidLayerUpInitAlloc_16u_C1R(&st, {4, 4}, 1.0f, k, 5, 2), zelStatusBadArgument);
  EXPECT_EQ(zeliPyramidLayerUpInitAlloc_16u_C1R(&st, {4, 4}, 10.001f, k, 5, 2), zelStatusBadArgument);
  EXPECT_EQ(zeliPyramidLayerUpInitAlloc_16u_C1R(&st, {4, 4}, 2.0f, k, 4, 2), zelStatusBadArgument);
  EXPECT_EQ(zeliPyramidLayerUpInitAlloc_16u_C1R(&st, {4, 4}, 2.0f, k, 1, 2), zelStatusBadArgument);
  EXPECT_EQ(st, sentinel);

  ZeliPyramidLayerState *down = nullptr, *up = nullptr;
  ASSERT_EQ(zeliPyramidLayerDownInitAlloc_16u_C1R(&down, {8, 8}, 2.0f, k, 5, 2), zelStatusOk);
  ASSERT_EQ(zeliPyramidLayerUpInitAlloc_16u_C3R(&up, {8, 8}, 2.0f, k, 5, 2), zelStatusOk);
  std::vector<Zel16u> src(8 * 8 * 3, 1), dst(16 * 16 * 3, 0x5A5A);
  Zel16u* d = dst.data();
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 16, {8, 8}, nullptr, 8, {4, 4}, down), zelStatusNullPointer);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 16, {8, 8}, d, 8, {4, 4}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 16, {8, 0}, d, 8, {4, 4}, down), zelStatusBadSize);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 14, {8, 8}, d, 8, {4, 4}, down), zelStatusBadStep);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 16, {8, 8}, d, 6, {4, 4}, down), zelStatusBadStep);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 17, {8, 8}, d, 8, {4, 4}, down), zelStatusMisalignedStep);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 16, {8, 8}, d, 8, {4, 4}, up), zelStatusBadContext);
  EXPECT_EQ(zeliPyramidLayerDown_8u_C1R(reinterpret_cast<Zel8u*>(src.data()), 8, {8, 8},
                                        reinterpret_cast<Zel8u*>(d), 4, {4, 4}, down),
            zelStatusBadDataType);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C3R(src.data(), 48, {8, 8}, d, 24, {4, 4}, down), zelStatusBadChannels);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 16, {8, 8}, d, 8, {4, 5}, down), zelStatusBadSize);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 16, {8, 8}, d, 8, {0, 4}, down), zelStatusBadSize);
  // Up: within the up range of 8 (15 .. 16 at rate 2).
  EXPECT_EQ(zeliPyramidLayerUp_16u_C3R(src.data(), 48, {8, 8}, d, 102, {17, 16}, up), zelStatusBadSize);
  EXPECT_EQ(zeliPyramidLayerUp_16u_C3R(src.data(), 48, {8, 8}, d, 96, {16, 8}, up), zelStatusBadSize);
  for (Zel16u v : dst) ASSERT_EQ(v, 0x5A5A);
  EXPECT_EQ(zeliPyramidLayerUp_16u_C3R(src.data(), 48, {8, 8}, d, 96, {15, 16}, up), zelStatusOk);
  EXPECT_EQ(zeliPyramidLayerDown_16u_C1R(src.data(), 16, {8, 8}, d, 8, {4, 4}, down), zelStatusOk);
  EXPECT_EQ(zeliPyramidLayerUpFree_8u_C1R(up), zelStatusOk);
  EXPECT_EQ(zeliPyramidLayerDownFree_16u_C1R(down), zelStatusOk);
  EXPECT_EQ(zeliPyramidLayerDownFree_16u_C1R(nullptr), zelStatusNullPointer);
}

TEST(PyramidLayer, AllocationFailureLeavesNothingBehind) {
  const Zel32f k[3] = {1, 2, 1};
  {
    zeltest::FaultInjection faults;
    faults.failAllocationsFrom(0);
    ZeliPyramidLayerState* st = reinterpret_cast<ZeliPyramidLayerState*>(&faults);
    EXPECT_EQ(zeliPyramidLayerDownInitAlloc_32f_C3R(&st, {30, 20}, 2.0f, k, 3, 2), zelStatusOutOfMemory);
    EXPECT_EQ(zeliPyramidLayerUpInitAlloc_32f_C3R(&st, {30, 20}, 2.0f, k, 3, 2), zelStatusOutOfMemory);
    EXPECT_EQ(st, reinterpret_cast<ZeliPyramidLayerState*>(&faults));
    EXPECT_EQ(faults.liveBlocks(), 0);
  }
  // The expansion's per-call tables.
  zeltest::FaultInjection faults;
  ZeliPyramidLayerState* st = nullptr;
  ASSERT_EQ(zeliPyramidLayerUpInitAlloc_32f_C1R(&st, {10, 10}, 2.0f, k, 3, 2), zelStatusOk);
  EXPECT_EQ(faults.allocations(), 1);
  std::vector<Zel32f> src(100), dst(400, 3.0f);
  faults.failAllocationsFrom(1);
  EXPECT_EQ(zeliPyramidLayerUp_32f_C1R(src.data(), 40, {10, 10}, dst.data(), 80, {20, 20}, st), zelStatusOutOfMemory);
  for (Zel32f v : dst) ASSERT_EQ(v, 3.0f);
  faults.failAllocationsFrom(-1);
  EXPECT_EQ(zeliPyramidLayerUp_32f_C1R(src.data(), 40, {10, 10}, dst.data(), 80, {20, 20}, st), zelStatusOk);
  EXPECT_EQ(faults.liveBlocks(), 1);
  EXPECT_EQ(zeliPyramidLayerUpFree_32f_C1R(st), zelStatusOk);
  EXPECT_EQ(faults.liveBlocks(), 0);
}

}  // namespace
