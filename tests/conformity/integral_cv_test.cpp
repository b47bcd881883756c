// Integral images against cv::integral: both define element (x + 1, y + 1) as
// the sum over rows 0..y and columns 0..x, with a zero first row and column.
#include <gtest/gtest.h>

#include <opencv2/imgproc.hpp>

#include "zelcv.h"

namespace {

TEST(IntegralConformity, PlainAndSquaredSumsMatch) {
  cv::RNG rng(11);
  for (int trial = 0; trial < 12; ++trial) {
    const int w = rng.uniform(1, 300), h = rng.uniform(1, 200);
    SCOPED_TRACE(testing::Message() << w << " x " << h);
    cv::Mat src(h, w, CV_8UC1);
    rng.fill(src, cv::RNG::UNIFORM, 0, 256);
    cv::Mat cvSum, cvSqr;
    cv::integral(src, cvSum, cvSqr, CV_32S, CV_64F);

    cv::Mat sum(h + 1, w + 1, CV_32SC1), sqr(h + 1, w + 1, CV_64FC1);
    ASSERT_EQ(zeliSqrIntegral_8u32s64f_C1R(src.ptr<Zel8u>(), int(src.step), sum.ptr<Zel32s>(),
                                           int(sum.step), sqr.ptr<Zel64f>(), int(sqr.step), {w, h},
                                           0, 0.0),
              zelStatusOk);
    EXPECT_EQ(cv::countNonZero(sum != cvSum), 0);
    EXPECT_EQ(cv::norm(sqr, cvSqr, cv::NORM_INF), 0.0);
  }
}

}  // namespace
