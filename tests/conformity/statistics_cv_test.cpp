// Masked statistics and sub-pixel utilities against OpenCV where the
// definitions coincide. Differences, stated per test:
// - Integer norms, sums and extrema are exact on both sides and must agree
//   exactly; 32f sums are added in a different order, so they agree to a
//   relative 1e-12 (both sum in double precision).
// - cv::mean and cv::meanStdDev multiply by 1 / n where we divide by n:
//   a relative 1e-12.
// - A channel of interest is compared through cv::extractChannel.
// - cv::getRectSubPix agrees bit for bit for 32f windows inside the image
//   (the same weights and order); 8u results use its 16-bit fixed-point
//   weights (within 1), 8u->32f its own factorisation (within 1e-3), and
//   windows over the border its own order (within 1e-3).
// - cv::LineIterator (8-connected) visits the same pixels.
// - cv::fastAtan2 evaluates the same polynomial: within 1e-4 degrees.
// - cv::cvtColor's BGR to grey weights, given as coefficients: within 1e-4.
#include <gtest/gtest.h>

#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>

#include "zelcv.h"

namespace {

cv::Mat randomMat(cv::RNG& rng, int w, int h, int type) {
  cv::Mat m(h, w, type);
  if (CV_MAT_DEPTH(type) == CV_32F)
    rng.fill(m, cv::RNG::UNIFORM, -100.0, 100.0);
  else if (CV_MAT_DEPTH(type) == CV_8S)
    rng.fill(m, cv::RNG::UNIFORM, -128, 128);
  else if (CV_MAT_DEPTH(type) == CV_16U)
    rng.fill(m, cv::RNG::UNIFORM, 0, 65536);
  else
    rng.fill(m, cv::RNG::UNIFORM, 0, 256);
  return m;
}

cv::Mat randomMask(cv::RNG& rng, int w, int h) {
  cv::Mat m = randomMat(rng, w, h, CV_8UC1);
  return m > 100;
}

void expectClose(double ours, double theirs, bool exact) {
  if (exact)
    EXPECT_EQ(ours, theirs);
  else
    EXPECT_NEAR(ours, theirs, 1e-12 * std::max(1.0, std::fabs(theirs)));
}

TEST(StatisticsConformity, NormsMeansAndExtremaOf8uAnd32f) {
  cv::RNG rng(19);
  for (int trial = 0; trial < 16; ++trial) {
    const bool isFloat = trial % 2 == 1;
    const int w = rng.uniform(1, 200), h = rng.uniform(1, 60);
    SCOPED_TRACE(testing::Message() << w << " x " << h << (isFloat ? " 32f" : " 8u"));
    const int type = isFloat ? CV_32FC1 : CV_8UC1;
    cv::Mat a = randomMat(rng, w, h, type), b = randomMat(rng, w, h, type), mask = randomMask(rng, w, h);
    const int cvNorms[3] = {cv::NORM_INF, cv::NORM_L1, cv::NORM_L2};
    for (int k = 0; k < 3; ++k) {
      Zel64f v = 0, vm = 0, d = 0, dm = 0, r = 0;
      if (isFloat) {
        using N = ZelStatus(ZELCV_CALL*)(const Zel32f*, int, ZeliSize, Zel64f*);
        using NM = ZelStatus(ZELCV_CALL*)(const Zel32f*, int, const Zel8u*, int, ZeliSize, Zel64f*);
        using D = ZelStatus(ZELCV_CALL*)(const Zel32f*, int, const Zel32f*, int, ZeliSize, Zel64f*);
        using DM = ZelStatus(ZELCV_CALL*)(const Zel32f*, int, const Zel32f*, int, const Zel8u*, int, ZeliSize, Zel64f*);
        const N n[3] = {zeliNorm_Inf_32f_C1R, zeliNorm_L1_32f_C1R, zeliNorm_L2_32f_C1R};
        const NM nm[3] = {zeliNorm_Inf_32f_C1MR, zeliNorm_L1_32f_C1MR, zeliNorm_L2_32f_C1MR};
        const D dd[3] = {zeliNormDiff_Inf_32f_C1R, zeliNormDiff_L1_32f_C1R, zeliNormDiff_L2_32f_C1R};
        const DM ddm[3] = {zeliNormDiff_Inf_32f_C1MR, zeliNormDiff_L1_32f_C1MR, zeliNormDiff_L2_32f_C1MR};
        const D rel[3] = {zeliNormRel_Inf_32f_C1R, zeliNormRel_L1_32f_C1R, zeliNormRel_L2_32f_C1R};
        const Zel32f* pa = a.ptr<Zel32f>();
        const Zel32f* pb = b.ptr<Zel32f>();
        ASSERT_EQ(n[k](pa, int(a.step), {w, h}, &v), 0);
        ASSERT_EQ(nm[k](pa, int(a.step), mask.data, int(mask.step), {w, h}, &vm), 0);
        ASSERT_EQ(dd[k](pa, int(a.step), pb, int(b.step), {w, h}, &d), 0);
        ASSERT_EQ(ddm[k](pa, int(a.step), pb, int(b.step), mask.data, int(mask.step), {w, h}, &dm), 0);
        ASSERT_EQ(rel[k](pa, int(a.step), pb, int(b.step), {w, h}, &r), 0);
      } else {
        using N = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, ZeliSize, Zel64f*);
        using NM = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, const Zel8u*, int, ZeliSize, Zel64f*);
        using D = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, const Zel8u*, int, ZeliSize, Zel64f*);
        using DM = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, const Zel8u*, int, const Zel8u*, int, ZeliSize, Zel64f*);
        const N n[3] = {zeliNorm_Inf_8u_C1R, zeliNorm_L1_8u_C1R, zeliNorm_L2_8u_C1R};
        const NM nm[3] = {zeliNorm_Inf_8u_C1MR, zeliNorm_L1_8u_C1MR, zeliNorm_L2_8u_C1MR};
        const D dd[3] = {zeliNormDiff_Inf_8u_C1R, zeliNormDiff_L1_8u_C1R, zeliNormDiff_L2_8u_C1R};
        const DM ddm[3] = {zeliNormDiff_Inf_8u_C1MR, zeliNormDiff_L1_8u_C1MR, zeliNormDiff_L2_8u_C1MR};
        const D rel[3] = {zeliNormRel_Inf_8u_C1R, zeliNormRel_L1_8u_C1R, zeliNormRel_L2_8u_C1R};
        ASSERT_EQ(n[k](a.data, int(a.step), {w, h}, &v), 0);
        ASSERT_EQ(nm[k](a.data, int(a.step), mask.data, int(mask.step), {w, h}, &vm), 0);
        ASSERT_EQ(dd[k](a.data, int(a.step), b.data, int(b.step), {w, h}, &d), 0);
        ASSERT_EQ(ddm[k](a.data, int(a.step), b.data, int(b.step), mask.data, int(mask.step), {w, h}, &dm), 0);
        ASSERT_EQ(rel[k](a.data, int(a.step), b.data, int(b.step), {w, h}, &r), 0);
      }
      // Infinity norms are exact for both types; sums exact for 8u only.
      const bool exact = !isFloat || k == 0;
      SCOPED_TRACE(testing::Message() << "norm " << k);
      expectClose(v, cv::norm(a, cvNorms[k]), exact);
      expectClose(vm, cv::norm(a, cvNorms[k], mask), exact);
      expectClose(d, cv::norm(a, b, cvNorms[k]), exact);
      expectClose(dm, cv::norm(a, b, cvNorms[k], mask), exact);
      expectClose(r, cv::norm(a, b, cvNorms[k] | cv::NORM_RELATIVE), false);
    }

    Zel64f mean = 0, m2 = 0, dev = 0, lo = 0, hi = 0;
    ZeliPoint loAt, hiAt;
    if (isFloat) {
      ASSERT_EQ(zeliMean_32f_C1MR(a.ptr<Zel32f>(), int(a.step), mask.data, int(mask.step), {w, h}, &mean), 0);
      ASSERT_EQ(zeliMean_StdDev_32f_C1R(a.ptr<Zel32f>(), int(a.step), {w, h}, &m2, &dev), 0);
      ASSERT_EQ(zeliMinMaxIndx_32f_C1MR(a.ptr<Zel32f>(), int(a.step), mask.data, int(mask.step), {w, h}, &lo, &hi,
                                        &loAt, &hiAt),
                0);
    } else {
      ASSERT_EQ(zeliMean_8u_C1MR(a.data, int(a.step), mask.data, int(mask.step), {w, h}, &mean), 0);
      ASSERT_EQ(zeliMean_StdDev_8u_C1R(a.data, int(a.step), {w, h}, &m2, &dev), 0);
      ASSERT_EQ(zeliMinMaxIndx_8u_C1MR(a.data, int(a.step), mask.data, int(mask.step), {w, h}, &lo, &hi, &loAt,
                                       &hiAt),
                0);
    }
    expectClose(mean, cv::mean(a, mask)[0], false);
    cv::Scalar cvMean, cvDev;
    cv::meanStdDev(a, cvMean, cvDev);
    expectClose(m2, cvMean[0], false);
    EXPECT_NEAR(dev, cvDev[0], 1e-9 * std::max(1.0, cvDev[0]));
    double cvLo = 0, cvHi = 0;
    cv::Point cvLoAt, cvHiAt;
    cv::minMaxLoc(a, &cvLo, &cvHi, &cvLoAt, &cvHiAt, mask);
    if (cv::countNonZero(mask) > 0) {
      // Both report the first location in raster order.
      EXPECT_EQ(lo, cvLo);
      EXPECT_EQ(hi, cvHi);
      EXPECT_EQ(loAt.x, cvLoAt.x);
      EXPECT_EQ(loAt.y, cvLoAt.y);
      EXPECT_EQ(hiAt.x, cvHiAt.x);
      EXPECT_EQ(hiAt.y, cvHiAt.y);
    }
  }
}

// 8s, 16u and the channel of interest of three-channel images.
TEST(StatisticsConformity, OtherTypesAndChannelOfInterest) {
  cv::RNG rng(20);
  for (int trial = 0; trial < 12; ++trial) {
    const int w = rng.uniform(1, 150), h = rng.uniform(1, 40), coi = 1 + trial % 3;
    cv::Mat mask = randomMask(rng, w, h);
    cv::Mat a16 = randomMat(rng, w, h, CV_16UC3), b16 = randomMat(rng, w, h, CV_16UC3);
    cv::Mat a8 = randomMat(rng, w, h, CV_8SC3);
    cv::Mat c16, d16, c8;
    cv::extractChannel(a16, c16, coi - 1);
    cv::extractChannel(b16, d16, coi - 1);
    cv::extractChannel(a8, c8, coi - 1);
    Zel64f v = 0, mean = 0, dev = 0, lo = 0, hi = 0;
    ZeliPoint loAt, hiAt;
    ASSERT_EQ(zeliNormDiff_L2_16u_C3CMR(a16.ptr<Zel16u>(), int(a16.step), b16.ptr<Zel16u>(), int(b16.step),
                                        mask.data, int(mask.step), {w, h}, coi, &v),
              0);
    EXPECT_EQ(v, cv::norm(c16, d16, cv::NORM_L2, mask));
    ASSERT_EQ(zeliNorm_L1_8s_C3CMR(a8.ptr<Zel8s>(), int(a8.step), mask.data, int(mask.step), {w, h}, coi, &v), 0);
    EXPECT_EQ(v, cv::norm(c8, cv::NORM_L1, mask));
    ASSERT_EQ(zeliMean_StdDev_16u_C3CMR(a16.ptr<Zel16u>(), int(a16.step), mask.data, int(mask.step), {w, h}, coi,
                                        &mean, &dev),
              0);
    cv::Scalar cvMean, cvDev;
    cv::meanStdDev(c16, cvMean, cvDev, mask);
    expectClose(mean, cvMean[0], false);
    EXPECT_NEAR(dev, cvDev[0], 1e-9 * std::max(1.0, cvDev[0]));
    ASSERT_EQ(zeliMinMaxIndx_8s_C3CMR(a8.ptr<Zel8s>(), int(a8.step), mask.data, int(mask.step), {w, h}, coi, &lo,
                                      &hi, &loAt, &hiAt),
              0);
    double cvLo, cvHi;
    cv::Point cvLoAt, cvHiAt;
    cv::minMaxLoc(c8, &cvLo, &cvHi, &cvLoAt, &cvHiAt, mask);
    if (cv::countNonZero(mask) > 0) {
      EXPECT_EQ(lo, cvLo);
      EXPECT_EQ(hi, cvHi);
      EXPECT_EQ(loAt.x, cvLoAt.x);
      EXPECT_EQ(loAt.y, cvLoAt.y);
      EXPECT_EQ(hiAt.x, cvHiAt.x);
      EXPECT_EQ(hiAt.y, cvHiAt.y);
    }
  }
}

TEST(StatisticsConformity, SubpixelWindowsMatchGetRectSubPix) {
  cv::RNG rng(21);
  cv::Mat src8 = randomMat(rng, 97, 61, CV_8UC1), src32;
  src8.convertTo(src32, CV_32F);
  for (int trial = 0; trial < 200; ++trial) {
    const cv::Size win(rng.uniform(1, 24), rng.uniform(1, 24));
    // Mostly inside, some over the border.
    const bool border = trial % 4 == 0;
    const float cx = border ? rng.uniform(-10.f, 107.f) : rng.uniform(win.width / 2.f + 1, 95.f - win.width / 2.f);
    const float cy = border ? rng.uniform(-10.f, 71.f) : rng.uniform(win.height / 2.f + 1, 59.f - win.height / 2.f);
    SCOPED_TRACE(testing::Message() << win << " at " << cx << ", " << cy);
    cv::Mat cv32, cv8, cv8f, z32(win, CV_32F), z8(win, CV_8U), z8f(win, CV_32F);
    cv::getRectSubPix(src32, win, {cx, cy}, cv32, CV_32F);
    cv::getRectSubPix(src8, win, {cx, cy}, cv8, CV_8U);
    cv::getRectSubPix(src8, win, {cx, cy}, cv8f, CV_32F);
    const ZeliPoint_32f c = {cx, cy};
    ASSERT_EQ(zeliCopySubpix_32f_C1R(src32.ptr<Zel32f>(), int(src32.step), {97, 61}, z32.ptr<Zel32f>(),
                                     int(z32.step), {win.width, win.height}, c),
              0);
    ASSERT_EQ(zeliCopySubpix_8u_C1R(src8.data, int(src8.step), {97, 61}, z8.data, int(z8.step),
                                    {win.width, win.height}, c),
              0);
    ASSERT_EQ(zeliCopySubpix_8u32f_C1R(src8.data, int(src8.step), {97, 61}, z8f.ptr<Zel32f>(), int(z8f.step),
                                       {win.width, win.height}, c),
              0);
    EXPECT_LE(cv::norm(z32, cv32, cv::NORM_INF), border ? 1e-3 : 0.0);
    EXPECT_LE(cv::norm(z8, cv8, cv::NORM_INF), 1.0);
    EXPECT_LE(cv::norm(z8f, cv8f, cv::NORM_INF), 1e-3);
  }
}

TEST(StatisticsConformity, SampleLineFollowsLineIterator) {
  cv::RNG rng(22);
  cv::Mat img = randomMat(rng, 83, 57, CV_8UC3);
  cv::Mat one = randomMat(rng, 83, 57, CV_32FC1);
  for (int trial = 0; trial < 300; ++trial) {
    const cv::Point p1(rng.uniform(0, 83), rng.uniform(0, 57)), p2(rng.uniform(0, 83), rng.uniform(0, 57));
    cv::LineIterator it(img, p1, p2, 8);
    std::vector<Zel8u> ours(size_t(it.count) * 3);
    std::vector<Zel32f> ours32(size_t(it.count));
    ASSERT_EQ(zeliSampleLine_8u_C3R(img.data, int(img.step), {83, 57}, {p1.x, p1.y}, {p2.x, p2.y}, ours.data()), 0);
    ASSERT_EQ(zeliSampleLine_32f_C1R(one.ptr<Zel32f>(), int(one.step), {83, 57}, {p1.x, p1.y}, {p2.x, p2.y},
                                     ours32.data()),
              0);
    for (int i = 0; i < it.count; ++i, ++it) {
      const cv::Point p = it.pos();
      const cv::Vec3b& px = img.at<cv::Vec3b>(p);
      ASSERT_EQ(ours[3 * i], px[0]) << p1 << " -> " << p2 << " step " << i;
      ASSERT_EQ(ours[3 * i + 2], px[2]);
      ASSERT_EQ(ours32[i], one.at<float>(p));
    }
  }
}

TEST(StatisticsConformity, FastArctanAndGreyWeights) {
  cv::RNG rng(23);
  std::vector<float> y(1001), x(1001), ours(1001);
  for (int i = 0; i < 1001; ++i) {
    y[i] = rng.uniform(-50.f, 50.f);
    x[i] = i % 50 == 0 ? 0.0f : rng.uniform(-50.f, 50.f);
  }
  ASSERT_EQ(zelibFastArctan_32f(y.data(), x.data(), ours.data(), 1001), 0);
  for (int i = 0; i < 1001; ++i) EXPECT_NEAR(ours[i], cv::fastAtan2(y[i], x[i]), 1e-4) << y[i] << ", " << x[i];

  // Grey weights as cv::cvtColor's for a BGR 32f image (c = 0.114, 0.587, 0.299).
  cv::Mat bgr = randomMat(rng, 41, 13, CV_32FC3), grey, ourGrey(13, 41, CV_32F);
  cv::cvtColor(bgr, grey, cv::COLOR_BGR2GRAY);
  const Zel32f weights[3] = {0.114f, 0.587f, 0.299f};
  ASSERT_EQ(zeliGradientColorToGray_32f_C3C1R(bgr.ptr<Zel32f>(), int(bgr.step), ourGrey.ptr<Zel32f>(),
                                              int(ourGrey.step), {41, 13}, weights),
            0);
  EXPECT_LE(cv::norm(ourGrey, grey, cv::NORM_INF), 1e-4);
}

}  // namespace
