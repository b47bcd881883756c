// Super-resolution residuals and gradients against the scalar model over
// random sizes, steps, start offsets, scales, offsets and point-spread
// functions, and on their intended use: steepest descent from four shifted
// low-resolution frames beats interpolating one of them.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <vector>

#include "abi/background_reference.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using zeltest::Layout;
using zeltest::TestImage;

struct Ops {
  int P;
  ZelStatus(ZELCV_CALL* init)(ZeliSRHNState**, const Zel32f*, int);
  ZelStatus(ZELCV_CALL* release)(ZeliSRHNState*);
  ZelStatus(ZELCV_CALL* residual)(const Zel8u*, int, const Zel32f*, int, Zel32f*, int, ZeliSize, ZeliSize, ZeliPoint,
                                  const ZeliSRHNState*);
  ZelStatus(ZELCV_CALL* gradient)(const Zel32f*, int, Zel32f*, int, ZeliSize, ZeliSize, ZeliPoint,
                                  const ZeliSRHNState*);
};
const Ops kOps[2] = {
    {2, zeliSRHNInitAlloc_PSF2x2, zeliSRHNFree_PSF2x2, zeliSRHNCalcResidual_PSF2x2_8u32f_C1R,
     zeliSRHNUpdateGradient_PSF2x2_32f_C1R},
    {3, zeliSRHNInitAlloc_PSF3x3, zeliSRHNFree_PSF3x3, zeliSRHNCalcResidual_PSF3x3_8u32f_C1R,
     zeliSRHNUpdateGradient_PSF3x3_32f_C1R},
};

std::vector<float> plain(const TestImage<Zel32f>& im) {
  std::vector<float> out;
  for (int y = 0; y < im.height(); ++y) out.insert(out.end(), im.row(y), im.row(y) + im.width());
  return out;
}

TEST(SRHN, ResidualAndGradientMatchReference) {
  std::mt19937 rng(41);
  for (const Ops& ops : kOps) {
    for (int trial = 0; trial < 60; ++trial) {
      const int scale = 1 + int(rng() % 4);
      const Layout lo = zeltest::randomLayout(rng, 40, 8, 1, 1);
      Layout hl = zeltest::randomLayout(rng, 1, 1, 1, 4, 4);
      // High-resolution size near scale x ROI, sometimes smaller so clamping
      // happens inside as well as at the edges.
      hl.width = std::max(1, lo.width * scale + int(rng() % 7) - 4);
      hl.height = std::max(1, lo.height * scale + int(rng() % 7) - 4);
      Layout rl = zeltest::randomLayout(rng, 1, 1, 1, 4, 4);
      rl.width = lo.width, rl.height = lo.height;
      TestImage<Zel8u> src(lo);
      TestImage<Zel32f> hr(hl), res(rl), grad(hl);
      src.fillRandom(rng, 0, 255);
      hr.fillRandom(rng, -50.0f, 300.0f);
      grad.fillRandom(rng, -5.0f, 5.0f);
      float psf[9];
      for (float& t : psf) t = std::uniform_real_distribution<float>(-0.2f, 0.6f)(rng);
      const ZeliPoint off{int(rng() % 9) - 4, int(rng() % 9) - 4};
      ZeliSRHNState* st = nullptr;
      ASSERT_EQ(ops.init(&st, psf, scale), zelStatusOk);
      ASSERT_EQ(ops.residual(src.data(), src.step(), hr.data(), hr.step(), res.data(), res.step(), src.size(),
                             hr.size(), off, st),
                zelStatusOk);
      bgref::Frame f{lo.width, lo.height, 1, {}};
      for (int y = 0; y < lo.height; ++y) f.px.insert(f.px.end(), src.row(y), src.row(y) + lo.width);
      const std::vector<float> want = bgref::residual(f, plain(hr), hl.width, hl.height, ops.P, psf, scale, off);
      const std::vector<float> got = plain(res);
      ASSERT_EQ(0, std::memcmp(want.data(), got.data(), want.size() * 4)) << ops.P << " trial " << trial;
      std::vector<float> g = plain(grad);
      bgref::gradient(want, lo.width, lo.height, g, hl.width, hl.height, ops.P, psf, scale, off);
      ASSERT_EQ(ops.gradient(res.data(), res.step(), grad.data(), grad.step(), src.size(), hr.size(), off, st),
                zelStatusOk);
      const std::vector<float> gotGrad = plain(grad);
      ASSERT_EQ(0, std::memcmp(g.data(), gotGrad.data(), g.size() * 4)) << ops.P << " trial " << trial;
      ASSERT_TRUE(res.sentinelIntact() && grad.sentinelIntact() && hr.sentinelIntact());
      ASSERT_EQ(ops.release(st), zelStatusOk);
    }
  }
}

TEST(SRHN, Checks) {
  const float psf[9] = {0.25f, 0.25f, 0.25f, 0.25f};
  ZeliSRHNState *s2 = nullptr, *s3 = nullptr;
  EXPECT_EQ(zeliSRHNInitAlloc_PSF2x2(&s2, psf, 0), zelStatusBadRange);
  EXPECT_EQ(zeliSRHNInitAlloc_PSF2x2(&s2, psf, 9), zelStatusBadRange);
  const float bad[4] = {0.25f, NAN, 0, 0};
  EXPECT_EQ(zeliSRHNInitAlloc_PSF2x2(&s2, bad, 2), zelStatusBadRange);
  EXPECT_EQ(zeliSRHNInitAlloc_PSF2x2(&s2, nullptr, 2), zelStatusNullPointer);
  EXPECT_EQ(s2, nullptr);
  ASSERT_EQ(zeliSRHNInitAlloc_PSF2x2(&s2, psf, 2), zelStatusOk);
  ASSERT_EQ(zeliSRHNInitAlloc_PSF3x3(&s3, psf, 2), zelStatusOk);
  std::vector<Zel8u> src(16, 1);
  std::vector<Zel32f> hr(64, 0.0f), res(16, 7.0f);
  const ZeliSize roi{4, 4}, hrSize{8, 8};
  EXPECT_EQ(zeliSRHNCalcResidual_PSF2x2_8u32f_C1R(src.data(), 4, hr.data(), 32, res.data(), 16, roi, hrSize,
                                                  ZeliPoint{0, 0}, s3),
            zelStatusBadContext);
  EXPECT_EQ(zeliSRHNCalcResidual_PSF3x3_8u32f_C1R(src.data(), 4, hr.data(), 32, res.data(), 16, roi,
                                                  ZeliSize{8, 0}, ZeliPoint{0, 0}, s3),
            zelStatusBadSize);
  EXPECT_EQ(zeliSRHNCalcResidual_PSF3x3_8u32f_C1R(src.data(), 4, hr.data(), 28, res.data(), 16, roi, hrSize,
                                                  ZeliPoint{0, 0}, s3),
            zelStatusBadStep);
  EXPECT_EQ(zeliSRHNUpdateGradient_PSF2x2_32f_C1R(res.data(), 16, hr.data(), 34, roi, hrSize, ZeliPoint{0, 0}, s2),
            zelStatusMisalignedStep);
  EXPECT_EQ(res, std::vector<Zel32f>(16, 7.0f));
  EXPECT_EQ(hr, std::vector<Zel32f>(64, 0.0f));
  // Offsets far outside clamp to the edges rather than overflowing.
  EXPECT_EQ(zeliSRHNUpdateGradient_PSF2x2_32f_C1R(res.data(), 16, hr.data(), 32, roi, hrSize,
                                                  ZeliPoint{0x7fffffff, -0x7fffffff - 1}, s2),
            zelStatusOk);
  EXPECT_FLOAT_EQ(hr[7], 16 * 4 * 0.25f * 7.0f);
  zeliSRHNFree_PSF2x2(s2);
  zeliSRHNFree_PSF3x3(s3);
}

double psnr(const std::vector<float>& a, const std::vector<float>& b) {
  double se = 0;
  for (size_t i = 0; i < a.size(); ++i) se += (double(a[i]) - b[i]) * (double(a[i]) - b[i]);
  return 10 * std::log10(255.0 * 255.0 / (se / double(a.size())));
}

// Four low-resolution frames, each the 2x2 mean of a sharp picture at one of
// the four half-pixel shifts: steepest descent with the residual and the
// gradient recovers detail that bilinear interpolation of one frame cannot.
TEST(SRHN, SteepestDescentBeatsInterpolation) {
  const int W = 96, H = 64, w = W / 2, h = H / 2;
  std::vector<float> truth(size_t(W) * H);
  for (int y = 0; y < H; ++y)
    for (int x = 0; x < W; ++x)
      truth[size_t(y) * W + x] = float(std::floor(127.5 + 100 * std::sin(x * 0.55) * std::cos(y * 0.35) +
                                                  (((x / 8 + y / 8) & 1) ? 20 : -20)));
  const float psf[4] = {0.25f, 0.25f, 0.25f, 0.25f};
  const ZeliPoint offsets[4] = {{0, 0}, {1, 0}, {0, 1}, {1, 1}};
  std::vector<std::vector<Zel8u>> frames(4, std::vector<Zel8u>(size_t(w) * h));
  for (int f = 0; f < 4; ++f)
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        float s = 0;
        for (int j = 0; j < 2; ++j)
          for (int i = 0; i < 2; ++i) {
            const int X = std::min(W - 1, 2 * x + offsets[f].x + i), Y = std::min(H - 1, 2 * y + offsets[f].y + j);
            s += 0.25f * truth[size_t(Y) * W + X];
          }
        frames[f][size_t(y) * w + x] = Zel8u(std::min(255.0f, std::max(0.0f, std::floor(s + 0.5f))));
      }
  // Bilinear interpolation of frame 0 (its samples sit at 2x + 0.5).
  std::vector<float> bilinear(truth.size());
  for (int y = 0; y < H; ++y)
    for (int x = 0; x < W; ++x) {
      const float fx = std::min(std::max((x - 0.5f) / 2, 0.0f), float(w - 1));
      const float fy = std::min(std::max((y - 0.5f) / 2, 0.0f), float(h - 1));
      const int x0 = int(fx), y0 = int(fy), x1 = std::min(x0 + 1, w - 1), y1 = std::min(y0 + 1, h - 1);
      const float ax = fx - x0, ay = fy - y0;
      auto at = [&](int xx, int yy) { return float(frames[0][size_t(yy) * w + xx]); };
      bilinear[size_t(y) * W + x] =
          (1 - ay) * ((1 - ax) * at(x0, y0) + ax * at(x1, y0)) + ay * ((1 - ax) * at(x0, y1) + ax * at(x1, y1));
    }
  ZeliSRHNState* st = nullptr;
  ASSERT_EQ(zeliSRHNInitAlloc_PSF2x2(&st, psf, 2), zelStatusOk);
  std::vector<float> est = bilinear, grad(truth.size()), res(size_t(w) * h);
  for (int it = 0; it < 100; ++it) {
    std::fill(grad.begin(), grad.end(), 0.0f);
    for (int f = 0; f < 4; ++f) {
      ASSERT_EQ(zeliSRHNCalcResidual_PSF2x2_8u32f_C1R(frames[f].data(), w, est.data(), W * 4, res.data(), w * 4,
                                                      ZeliSize{w, h}, ZeliSize{W, H}, offsets[f], st),
                zelStatusOk);
      ASSERT_EQ(zeliSRHNUpdateGradient_PSF2x2_32f_C1R(res.data(), w * 4, grad.data(), W * 4, ZeliSize{w, h},
                                                      ZeliSize{W, H}, offsets[f], st),
                zelStatusOk);
    }
    for (size_t i = 0; i < est.size(); ++i) est[i] += grad[i];
  }
  zeliSRHNFree_PSF2x2(st);
  const double pSr = psnr(est, truth), pBilinear = psnr(bilinear, truth);
  printf("PSNR: steepest descent %.2f dB, bilinear %.2f dB\n", pSr, pBilinear);
  EXPECT_GT(pSr, pBilinear + 3.0);
}

}  // namespace
