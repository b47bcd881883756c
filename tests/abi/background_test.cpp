// Foreground models and the mixture model against the scalar models of
// background_reference.h: random sizes, steps, start offsets and parameters,
// frame after frame, masks and background images compared bit for bit.
#include <gtest/gtest.h>

#include <random>
#include <vector>

#include "abi/background_reference.h"
#include "abi/background_video.h"
#include "support/fault_injection.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::TestImage;

// A frame that mostly repeats its predecessor (so histogram bins fill up and
// halve), with noise and occasional jumps (so models see foreground).
void nextFrame(std::mt19937& rng, bgref::Frame& f) {
  std::uniform_int_distribution<int> pick(0, 99), noise(-3, 3), any(0, 255);
  for (auto& v : f.px) {
    const int r = pick(rng);
    if (r < 5)
      v = uint8_t(any(rng));
    else if (r < 60)
      v = uint8_t(std::min(255, std::max(0, v + noise(rng))));
  }
}

void toImage(const bgref::Frame& f, TestImage<Zel8u>& im) {
  for (int y = 0; y < f.height; ++y)
    for (int i = 0; i < f.width * f.channels; ++i) im.row(y)[i] = f.px[(size_t(y) * f.width) * f.channels + i];
}

std::vector<uint8_t> fromImage(const TestImage<Zel8u>& im) {
  std::vector<uint8_t> out;
  for (int y = 0; y < im.height(); ++y)
    out.insert(out.end(), im.row(y), im.row(y) + im.width() * im.channels());
  return out;
}

template <int C>
struct Calls;
template <>
struct Calls<1> {
  static constexpr auto histInit = zeliForegroundHistogramInitAlloc_8u_C1R;
  static constexpr auto hist = zeliForegroundHistogram_8u_C1R;
  static constexpr auto histUpdate = zeliForegroundHistogramUpdate_8u_C1R;
  static constexpr auto histFree = zeliForegroundHistogramFree_8u_C1R;
  static constexpr auto gaussInit = zeliForegroundGaussianInitAlloc_8u_C1R;
  static constexpr auto gauss = zeliForegroundGaussian_8u_C1R;
  static constexpr auto gaussUpdate = zeliForegroundGaussianUpdate_8u_C1R;
  static constexpr auto gaussFree = zeliForegroundGaussianFree_8u_C1R;
};
template <>
struct Calls<3> {
  static constexpr auto histInit = zeliForegroundHistogramInitAlloc_8u_C3R;
  static constexpr auto hist = zeliForegroundHistogram_8u_C3R;
  static constexpr auto histUpdate = zeliForegroundHistogramUpdate_8u_C3R;
  static constexpr auto histFree = zeliForegroundHistogramFree_8u_C3R;
  static constexpr auto gaussInit = zeliForegroundGaussianInitAlloc_8u_C3R;
  static constexpr auto gauss = zeliForegroundGaussian_8u_C3R;
  static constexpr auto gaussUpdate = zeliForegroundGaussianUpdate_8u_C3R;
  static constexpr auto gaussFree = zeliForegroundGaussianFree_8u_C3R;
};

template <int C>
void histogramAgainstReference(uint32_t seed) {
  std::mt19937 rng(seed);
  for (int trial = 0; trial < 12; ++trial) {
    const Layout l = zeltest::randomLayout(rng, 70, 9, C, 1);
    TestImage<Zel8u> src(l);
    Layout ml = zeltest::randomLayout(rng, 1, 1, 1, 1);
    ml.width = l.width, ml.height = l.height;
    TestImage<Zel8u> mask(ml);
    bgref::Frame f{l.width, l.height, C, std::vector<uint8_t>(size_t(l.width) * l.height * C)};
    for (auto& v : f.px) v = uint8_t(rng() & 255);
    ZeliFGHistogramParams p{std::uniform_real_distribution<float>(0.005f, 0.5f)(rng),
                            std::uniform_int_distribution<int>(1, 255)(rng)};
    toImage(f, src);
    ZeliFGHistogramState* st = nullptr;
    ASSERT_EQ(Calls<C>::histInit(src.data(), src.step(), src.size(), &st, &p), zelStatusOk);
    bgref::Histogram ref(f, p.threshold, p.initCount);
    for (int t = 0; t < 300; ++t) {
      nextFrame(rng, f);
      toImage(f, src);
      if (t % 10 == 0 || t > 280) {
        ASSERT_EQ(Calls<C>::hist(src.data(), src.step(), mask.data(), mask.step(), src.size(), st), zelStatusOk);
        ASSERT_EQ(fromImage(mask), ref.detect(f)) << "trial " << trial << " frame " << t;
        ASSERT_TRUE(mask.sentinelIntact());
      }
      ASSERT_EQ(Calls<C>::histUpdate(src.data(), src.step(), src.size(), st), zelStatusOk);
      ref.update(f);
    }
    ASSERT_TRUE(src.sentinelIntact());
    EXPECT_EQ(Calls<C>::histFree(st), zelStatusOk);
  }
}

TEST(ForegroundHistogram, C1MatchesReferenceOverManyUpdates) { histogramAgainstReference<1>(11); }
TEST(ForegroundHistogram, C3MatchesReferenceOverManyUpdates) { histogramAgainstReference<3>(12); }

template <int C>
void gaussianAgainstReference(uint32_t seed) {
  std::mt19937 rng(seed);
  for (int trial = 0; trial < 16; ++trial) {
    const Layout l = zeltest::randomLayout(rng, 90, 7, C, 1);
    TestImage<Zel8u> src(l);
    Layout ml = zeltest::randomLayout(rng, 1, 1, 1, 1);
    ml.width = l.width, ml.height = l.height;
    TestImage<Zel8u> mask(ml);
    bgref::Frame f{l.width, l.height, C, std::vector<uint8_t>(size_t(l.width) * l.height * C)};
    for (auto& v : f.px) v = uint8_t(rng() & 255);
    std::uniform_real_distribution<float> u(0.0f, 1.0f);
    ZeliFGGaussianParams p{0.001f + 0.3f * u(rng), 1.0f + 3.0f * u(rng), 1.0f + 400.0f * u(rng), 0.5f + 20 * u(rng)};
    toImage(f, src);
    ZeliFGGaussianState* st = nullptr;
    ASSERT_EQ(Calls<C>::gaussInit(src.data(), src.step(), src.size(), &st, &p), zelStatusOk);
    bgref::Gaussian ref(f, p);
    for (int t = 0; t < 40; ++t) {
      nextFrame(rng, f);
      toImage(f, src);
      ASSERT_EQ(Calls<C>::gauss(src.data(), src.step(), mask.data(), mask.step(), src.size(), st), zelStatusOk);
      ASSERT_EQ(fromImage(mask), ref.detect(f)) << "trial " << trial << " frame " << t;
      ASSERT_EQ(Calls<C>::gaussUpdate(src.data(), src.step(), src.size(), st), zelStatusOk);
      ref.update(f);
    }
    ASSERT_TRUE(mask.sentinelIntact());
    ASSERT_TRUE(src.sentinelIntact());
    EXPECT_EQ(Calls<C>::gaussFree(st), zelStatusOk);
  }
}

TEST(ForegroundGaussian, C1MatchesReferenceFrameAfterFrame) { gaussianAgainstReference<1>(21); }
TEST(ForegroundGaussian, C3MatchesReferenceFrameAfterFrame) { gaussianAgainstReference<3>(22); }

// The mixture model in blocks at odd addresses, random component counts and
// parameters: every mask and every background image equals the reference's.
TEST(FGMM, MatchesReferenceFrameAfterFrame) {
  std::mt19937 rng(31);
  std::uniform_real_distribution<float> u(0.0f, 1.0f);
  for (int trial = 0; trial < 24; ++trial) {
    const Layout l = zeltest::randomLayout(rng, 37, 6, 3, 1);
    TestImage<Zel8u> src(l);
    Layout ml = zeltest::randomLayout(rng, 1, 1, 1, 1);
    ml.width = l.width, ml.height = l.height;
    TestImage<Zel8u> mask(ml);
    Layout bl = zeltest::randomLayout(rng, 1, 1, 3, 1);
    bl.width = l.width, bl.height = l.height;
    TestImage<Zel8u> background(bl);
    const int K = 1 + trial % 8;
    ZeliFGMMParams p{0.001f + 0.2f * u(rng), 2.0f + 30 * u(rng), 1.0f + 20 * u(rng), 0.3f + 0.7f * u(rng),
                     0, 1.0f + 10 * u(rng), 0, 0.2f * u(rng)};
    p.varInit = p.varMin + 30 * u(rng);
    p.varMax = p.varInit + 100 * u(rng);
    if (trial == 0) p = ZeliFGMMParams{0.002f, 16.0f, 9.0f, 0.9f, 15.0f, 4.0f, 75.0f, 0.05f};
    int bytes = 0;
    ASSERT_EQ(zeliFGMMGetBufferSize_8u_C3R(src.size(), K, &bytes), zelStatusOk);
    const int shift = int(rng() % 61);
    std::vector<uint8_t> block(size_t(bytes) + 64);
    auto* st = reinterpret_cast<ZeliFGMMState*>(block.data() + shift);
    ASSERT_EQ(zeliFGMMInit_8u_C3R(src.size(), K, trial == 0 ? nullptr : &p, st), zelStatusOk);
    bgref::Mixture ref(l.width, l.height, K, p);
    bgref::Frame f{l.width, l.height, 3, std::vector<uint8_t>(size_t(l.width) * l.height * 3)};
    for (auto& v : f.px) v = uint8_t(rng() & 255);
    for (int t = 0; t < 60; ++t) {
      if (t) nextFrame(rng, f);
      toImage(f, src);
      ASSERT_EQ(zeliFGMMForeground_8u_C3R(src.data(), src.step(), mask.data(), mask.step(), src.size(), st),
                zelStatusOk);
      ASSERT_EQ(fromImage(mask), ref.apply(f)) << "trial " << trial << " frame " << t;
      ASSERT_EQ(zeliFGMMBackground_8u_C3R(background.data(), background.step(), src.size(), st), zelStatusOk);
      ASSERT_EQ(fromImage(background), ref.background()) << "trial " << trial << " frame " << t;
    }
    ASSERT_TRUE(mask.sentinelIntact());
    ASSERT_TRUE(background.sentinelIntact());
  }
}

// A model built at one address and used at another with the same alignment
// behaves the same; before any frame the background is 0.
TEST(FGMM, FreshModelHasEmptyBackgroundAndFirstFrameIsForeground) {
  const ZeliSize roi{9, 2};
  int bytes = 0;
  ASSERT_EQ(zeliFGMMGetBufferSize_8u_C3R(roi, 3, &bytes), zelStatusOk);
  std::vector<uint8_t> block(static_cast<size_t>(bytes)), src(9 * 2 * 3, 77), bg(9 * 2 * 3, 1), mask(18, 0);
  auto* st = reinterpret_cast<ZeliFGMMState*>(block.data());
  ASSERT_EQ(zeliFGMMInit_8u_C3R(roi, 3, nullptr, st), zelStatusOk);
  ASSERT_EQ(zeliFGMMBackground_8u_C3R(bg.data(), 27, roi, st), zelStatusOk);
  EXPECT_EQ(bg, std::vector<uint8_t>(54, 0));
  ASSERT_EQ(zeliFGMMForeground_8u_C3R(src.data(), 27, mask.data(), 9, roi, st), zelStatusOk);
  EXPECT_EQ(mask, std::vector<uint8_t>(18, 255));
  ASSERT_EQ(zeliFGMMForeground_8u_C3R(src.data(), 27, mask.data(), 9, roi, st), zelStatusOk);
  EXPECT_EQ(mask, std::vector<uint8_t>(18, 0));
  ASSERT_EQ(zeliFGMMBackground_8u_C3R(bg.data(), 27, roi, st), zelStatusOk);
  EXPECT_EQ(bg, src);
}

// Two components of exactly equal weight: the one of lower index ranks
// before the other, not the other way round. Frames A then B (learning rate
// 0.5, no complexity) leave weights 0.5 and 0.5; a third frame B finds
// component 1 close with 0.5 ranked before it (foreground for ratio 0.4),
// a third frame A finds component 0 close with nothing before it
// (background). 21 pixels wide: whole runs of eight or sixteen pixels and a
// remainder; two components and five (three of them never used).
TEST(FGMM, EqualWeightsRankByIndex) {
  const ZeliSize roi{21, 2};
  const ZeliFGMMParams p{0.5f, 16.0f, 9.0f, 0.4f, 15.0f, 4.0f, 75.0f, 0.0f};
  for (const int K : {2, 5})
  for (const bool againB : {true, false}) {
    int bytes = 0;
    ASSERT_EQ(zeliFGMMGetBufferSize_8u_C3R(roi, K, &bytes), zelStatusOk);
    std::vector<uint8_t> block(static_cast<size_t>(bytes)), a(21 * 2 * 3, 10), b(21 * 2 * 3, 110), mask(42, 7);
    auto* st = reinterpret_cast<ZeliFGMMState*>(block.data());
    ASSERT_EQ(zeliFGMMInit_8u_C3R(roi, K, &p, st), zelStatusOk);
    ASSERT_EQ(zeliFGMMForeground_8u_C3R(a.data(), 63, mask.data(), 21, roi, st), zelStatusOk);
    ASSERT_EQ(zeliFGMMForeground_8u_C3R(b.data(), 63, mask.data(), 21, roi, st), zelStatusOk);
    EXPECT_EQ(mask, std::vector<uint8_t>(42, 255));
    ASSERT_EQ(zeliFGMMForeground_8u_C3R(againB ? b.data() : a.data(), 63, mask.data(), 21, roi, st), zelStatusOk);
    EXPECT_EQ(mask, std::vector<uint8_t>(42, againB ? 255 : 0)) << K << (againB ? " components, B, B" : " components, B, A");
  }
}

// Checks after the common ones: a state of another kind -17, another size
// -6, parameters -7, and nothing written on failure.
TEST(BackgroundModels, StateKindSizeAndParameterChecks) {
  const ZeliSize roi{8, 4};
  std::vector<uint8_t> src(8 * 4 * 3, 100), mask(32, 7);
  ZeliFGHistogramState* h1 = nullptr;
  ZeliFGGaussianState* g3 = nullptr;
  ASSERT_EQ(zeliForegroundHistogramInitAlloc_8u_C1R(src.data(), 8, roi, &h1, nullptr), zelStatusOk);
  ASSERT_EQ(zeliForegroundGaussianInitAlloc_8u_C3R(src.data(), 24, roi, &g3, nullptr), zelStatusOk);
  EXPECT_EQ(zeliForegroundHistogram_8u_C3R(src.data(), 24, mask.data(), 8, roi, h1), zelStatusBadContext);
  EXPECT_EQ(zeliForegroundGaussian_8u_C1R(src.data(), 8, mask.data(), 8, roi,
                                          reinterpret_cast<ZeliFGGaussianState*>(h1)),
            zelStatusBadContext);
  EXPECT_EQ(zeliForegroundHistogram_8u_C1R(src.data(), 8, mask.data(), 8, ZeliSize{7, 4}, h1), zelStatusBadSize);
  EXPECT_EQ(zeliForegroundGaussianUpdate_8u_C3R(src.data(), 24, ZeliSize{8, 3}, g3), zelStatusBadSize);
  EXPECT_EQ(mask, std::vector<uint8_t>(32, 7));
  EXPECT_EQ(zeliForegroundHistogramFree_8u_C1R(h1), zelStatusOk);
  EXPECT_EQ(zeliForegroundGaussianFree_8u_C3R(g3), zelStatusOk);
  EXPECT_EQ(zeliForegroundGaussianFree_8u_C3R(nullptr), zelStatusNullPointer);

  ZeliFGHistogramState* h = nullptr;
  for (ZeliFGHistogramParams p : {ZeliFGHistogramParams{0.0f, 5}, ZeliFGHistogramParams{1.5f, 5},
                                  ZeliFGHistogramParams{0.1f, 0}, ZeliFGHistogramParams{0.1f, 256},
                                  ZeliFGHistogramParams{NAN, 5}}) {
    EXPECT_EQ(zeliForegroundHistogramInitAlloc_8u_C1R(src.data(), 8, roi, &h, &p), zelStatusBadRange);
    EXPECT_EQ(h, nullptr);
  }
  ZeliFGGaussianState* g = nullptr;
  for (ZeliFGGaussianParams p : {ZeliFGGaussianParams{0, 2, 3, 4}, ZeliFGGaussianParams{1.01f, 2, 3, 4},
                                 ZeliFGGaussianParams{0.1f, 0, 3, 4}, ZeliFGGaussianParams{0.1f, 2, INFINITY, 4},
                                 ZeliFGGaussianParams{0.1f, 2, 3, -1}}) {
    EXPECT_EQ(zeliForegroundGaussianInitAlloc_8u_C1R(src.data(), 8, roi, &g, &p), zelStatusBadRange);
    EXPECT_EQ(g, nullptr);
  }
  const ZeliFGMMParams good{0.002f, 16.0f, 9.0f, 0.9f, 15.0f, 4.0f, 75.0f, 0.05f};
  std::vector<uint8_t> block(4096, 0xCD);
  auto* st = reinterpret_cast<ZeliFGMMState*>(block.data());
  int bytes = 0;
  EXPECT_EQ(zeliFGMMGetBufferSize_8u_C3R(roi, 0, &bytes), zelStatusBadRange);
  EXPECT_EQ(zeliFGMMGetBufferSize_8u_C3R(roi, 9, &bytes), zelStatusBadRange);
  EXPECT_EQ(zeliFGMMGetBufferSize_8u_C3R(ZeliSize{0x7fffffff, 0x7fffffff}, 8, &bytes), zelStatusBadSize);
  for (int field = 0; field < 9; ++field) {
    ZeliFGMMParams p = good;
    switch (field) {
      case 0: p.alpha = 0; break;
      case 1: p.varThreshold = -1; break;
      case 2: p.varThresholdGen = NAN; break;
      case 3: p.backgroundRatio = 1.5f; break;
      case 4: p.varInit = 3; break;
      case 5: p.varMax = 10; break;
      case 6: p.varMin = 0; break;
      case 7: p.complexity = 1; break;
      default: p.complexity = -0.5f; break;
    }
    EXPECT_EQ(zeliFGMMInit_8u_C3R(roi, 2, &p, st), zelStatusBadRange) << field;
  }
  EXPECT_EQ(block, std::vector<uint8_t>(4096, 0xCD));
  ASSERT_EQ(zeliFGMMInit_8u_C3R(roi, 2, &good, st), zelStatusOk);
  EXPECT_EQ(zeliFGMMForeground_8u_C3R(src.data(), 24, mask.data(), 8, ZeliSize{8, 5}, st), zelStatusBadSize);
  EXPECT_EQ(zeliFGMMBackground_8u_C3R(src.data(), 24, roi, reinterpret_cast<ZeliFGMMState*>(src.data())),
            zelStatusBadContext);
}

TEST(BackgroundModels, FailedAllocationLeavesNothing) {
  const ZeliSize roi{16, 16};
  std::vector<uint8_t> src(16 * 16 * 3, 9);
  zeltest::FaultInjection faults;
  faults.failAllocationsFrom(0);
  ZeliFGHistogramState* h = nullptr;
  ZeliFGGaussianState* g = nullptr;
  ZeliSRHNState* s = nullptr;
  const float psf[9] = {1};
  EXPECT_EQ(zeliForegroundHistogramInitAlloc_8u_C3R(src.data(), 48, roi, &h, nullptr), zelStatusOutOfMemory);
  EXPECT_EQ(zeliForegroundGaussianInitAlloc_8u_C1R(src.data(), 16, roi, &g, nullptr), zelStatusOutOfMemory);
  EXPECT_EQ(zeliSRHNInitAlloc_PSF3x3(&s, psf, 2), zelStatusOutOfMemory);
  EXPECT_EQ(h, nullptr);
  EXPECT_EQ(g, nullptr);
  EXPECT_EQ(s, nullptr);
  EXPECT_EQ(faults.liveBlocks(), 0);
}

// The models on a noisy video with moving objects: each finds most of the
// objects and little else once it has learnt the background.
TEST(BackgroundModels, FindMovingObjectsInSyntheticVideo) {
  const bgvideo::Video v = bgvideo::make(96, 72, 80);
  const ZeliSize roi{v.width, v.height};
  const int step = v.width * 3;
  std::vector<uint8_t> mask(size_t(v.width) * v.height);
  int bytes = 0;
  ASSERT_EQ(zeliFGMMGetBufferSize_8u_C3R(roi, 4, &bytes), zelStatusOk);
  std::vector<uint8_t> block(static_cast<size_t>(bytes));
  auto* mm = reinterpret_cast<ZeliFGMMState*>(block.data());
  ASSERT_EQ(zeliFGMMInit_8u_C3R(roi, 4, nullptr, mm), zelStatusOk);
  ZeliFGGaussianState* g = nullptr;
  ZeliFGHistogramState* h = nullptr;
  const ZeliFGGaussianParams gp{0.02f, 3.0f, 225.0f, 16.0f};
  ASSERT_EQ(zeliForegroundGaussianInitAlloc_8u_C3R(v.frames[0].data(), step, roi, &g, &gp), zelStatusOk);
  ASSERT_EQ(zeliForegroundHistogramInitAlloc_8u_C3R(v.frames[0].data(), step, roi, &h, nullptr), zelStatusOk);
  bgvideo::Score sm, sg, sh;
  for (size_t t = 0; t < v.frames.size(); ++t) {
    const uint8_t* f = v.frames[t].data();
    ASSERT_EQ(zeliFGMMForeground_8u_C3R(f, step, mask.data(), v.width, roi, mm), zelStatusOk);
    if (t >= 40) sm.add(mask, v.truth[t]);
    ASSERT_EQ(zeliForegroundGaussian_8u_C3R(f, step, mask.data(), v.width, roi, g), zelStatusOk);
    if (t >= 40) sg.add(mask, v.truth[t]);
    ASSERT_EQ(zeliForegroundHistogram_8u_C3R(f, step, mask.data(), v.width, roi, h), zelStatusOk);
    if (t >= 40) sh.add(mask, v.truth[t]);
    ASSERT_EQ(zeliForegroundGaussianUpdate_8u_C3R(f, step, roi, g), zelStatusOk);
    ASSERT_EQ(zeliForegroundHistogramUpdate_8u_C3R(f, step, roi, h), zelStatusOk);
  }
  RecordProperty("mixture_precision", std::to_string(sm.precision()));
  EXPECT_GT(sm.precision(), 0.9);
  EXPECT_GT(sm.recall(), 0.85);
  EXPECT_GT(sg.recall(), 0.5);
  EXPECT_GT(sh.recall(), 0.8);
  EXPECT_GT(sh.precision(), 0.3);
  EXPECT_GT(sg.precision(), 0.9);
  printf("mixture P %.3f R %.3f, gaussian P %.3f R %.3f, histogram P %.3f R %.3f\n", sm.precision(), sm.recall(),
         sg.precision(), sg.recall(), sh.precision(), sh.recall());
  zeliForegroundGaussianFree_8u_C3R(g);
  zeliForegroundHistogramFree_8u_C3R(h);
}

}  // namespace
