// Distance transforms against cv::distanceTransform where the definitions
// coincide. Both measure the distance to the nearest 0 pixel and never step
// outside the image. They differ in these respects, which the tests respect:
// - OpenCV's chamfer masks run on 16-bit fixed-point weights (0.955 becomes
//   62588 / 65536), ours on the single-precision weights themselves, so the
//   Euclidean-approximating masks agree to within that rounding; the integer
//   masks (city block 1, 2 and chessboard 1, 1) agree exactly;
// - an image without 0 pixels has no defined result in OpenCV;
// - OpenCV has no 16-bit result and no signed (fast-marching) transform.
#include <gtest/gtest.h>

#include <opencv2/imgproc.hpp>

#include "zelcv.h"

namespace {

cv::Mat featureImage(cv::RNG& rng, int w, int h, double density) {
  cv::Mat src(h, w, CV_8UC1, cv::Scalar(1));
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      if (rng.uniform(0.0, 1.0) < density) src.at<uchar>(y, x) = 0;
  src.at<uchar>(rng.uniform(0, h), rng.uniform(0, w)) = 0;
  return src;
}

using Chamfer32f = decltype(&zeliDistanceTransform_3x3_8u32f_C1R);

TEST(DistanceConformity, ChamferMasks) {
  struct Row {
    int type, mask;
    Chamfer32f fn;
    int kerSize, norm;
    double tolerance;  // relative
  } rows[] = {
      {cv::DIST_C, 3, zeliDistanceTransform_3x3_8u32f_C1R, 3, 0, 0.0},
      {cv::DIST_L1, 3, zeliDistanceTransform_3x3_8u32f_C1R, 3, 1, 0.0},
      {cv::DIST_L2, 3, zeliDistanceTransform_3x3_8u32f_C1R, 3, 2, 1e-4},
      {cv::DIST_L2, 5, zeliDistanceTransform_5x5_8u32f_C1R, 5, 2, 1e-4},
  };
  cv::RNG rng(31);
  for (const Row& r : rows)
    for (int trial = 0; trial < 8; ++trial) {
      const int w = rng.uniform(1, 300), h = rng.uniform(1, 200);
      SCOPED_TRACE(testing::Message() << "type " << r.type << " mask " << r.mask << ", " << w << " x " << h);
      const cv::Mat src = featureImage(rng, w, h, trial % 2 ? 0.001 : 0.05);
      cv::Mat want;
      cv::distanceTransform(src, want, r.type, r.mask, CV_32F);
      Zel32f metrics[3];
      ASSERT_EQ(zeliGetDistanceTransformMask_32f(r.kerSize, r.norm, metrics), zelStatusOk);
      cv::Mat got(h, w, CV_32FC1);
      ASSERT_EQ(r.fn(src.data, int(src.step), got.ptr<Zel32f>(), int(got.step), {w, h}, metrics), zelStatusOk);
      for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) {
          const float a = got.at<float>(y, x), b = want.at<float>(y, x);
          ASSERT_NEAR(a, b, r.tolerance * b) << "at " << x << ", " << y;
        }
    }
}

// City-block distances with 8-bit results, saturated at 255 in both.
TEST(DistanceConformity, CityBlock8u) {
  cv::RNG rng(32);
  for (int trial = 0; trial < 8; ++trial) {
    const int w = rng.uniform(1, 700), h = rng.uniform(1, 400);
    SCOPED_TRACE(testing::Message() << w << " x " << h);
    const cv::Mat src = featureImage(rng, w, h, trial % 2 ? 0.00001 : 0.02);
    cv::Mat want;
    cv::distanceTransform(src, want, cv::DIST_L1, 3, CV_8U);
    const Zel32s metrics[2] = {1, 2};
    cv::Mat got(h, w, CV_8UC1);
    ASSERT_EQ(zeliDistanceTransform_3x3_8u_C1R(src.data, int(src.step), got.data, int(got.step), {w, h}, metrics),
              zelStatusOk);
    EXPECT_EQ(cv::countNonZero(got != want), 0);
  }
}

TEST(DistanceConformity, ExactEuclidean) {
  cv::RNG rng(33);
  for (int trial = 0; trial < 10; ++trial) {
    const int w = rng.uniform(1, 400), h = rng.uniform(1, 300);
    SCOPED_TRACE(testing::Message() << w << " x " << h);
    const cv::Mat src = featureImage(rng, w, h, trial % 3 == 0 ? 0.3 : 0.002);
    cv::Mat want;
    cv::distanceTransform(src, want, cv::DIST_L2, cv::DIST_MASK_PRECISE, CV_32F);
    int size = 0;
    ASSERT_EQ(zeliTrueDistanceTransformGetBufferSize_8u32f_C1R({w, h}, &size), zelStatusOk);
    std::vector<Zel8u> buffer(static_cast<size_t>(size));
    cv::Mat got(h, w, CV_32FC1);
    ASSERT_EQ(zeliTrueDistanceTransform_8u32f_C1R(src.data, int(src.step), got.ptr<Zel32f>(), int(got.step), {w, h},
                                                  buffer.data()),
              zelStatusOk);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        const float a = got.at<float>(y, x), b = want.at<float>(y, x);
        ASSERT_NEAR(a, b, 1e-6 * b) << "at " << x << ", " << y;
      }
  }
}

}  // namespace
