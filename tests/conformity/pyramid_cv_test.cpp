// Gaussian pyramid levels against cv::pyrDown and cv::pyrUp. Both use the
// binomial 5-tap kernel; pyrDown reflects without repeating the edge, and
// pyrUp reflects at the top and left and repeats the last row and column, as
// we do, so 8-bit results agree exactly (also for one- and two-row images,
// where our equal row weights coincide with the reflection). Float results
// agree to rounding: the order of the additions differs.
#include <gtest/gtest.h>

#include <vector>

#include <opencv2/imgproc.hpp>

#include "zelcv.h"

namespace {

template <typename Fn>
cv::Mat runOurs(const cv::Mat& src, cv::Size dsize, bool down, Fn fn) {
  int bytes = 0;
  const ZelDataType code = src.depth() == CV_8U ? zel8u : zel32f;
  (down ? zeliPyrDownGetBufSize_Gauss5x5 : zeliPyrUpGetBufSize_Gauss5x5)(src.cols, code, src.channels(), &bytes);
  std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
  cv::Mat dst(dsize, src.type());
  EXPECT_EQ(fn(src, dst, buffer.data()), zelStatusOk);
  return dst;
}

TEST(PyramidConformity, EightBitLevelsMatchExactly) {
  cv::RNG rng(5);
  for (int trial = 0; trial < 40; ++trial) {
    const int w = trial < 10 ? rng.uniform(1, 6) : rng.uniform(1, 300);
    const int h = trial < 10 ? rng.uniform(1, 6) : rng.uniform(1, 200);
    for (int ch : {1, 3}) {
      SCOPED_TRACE(testing::Message() << w << " x " << h << " C" << ch);
      cv::Mat src(h, w, CV_8UC(ch));
      rng.fill(src, cv::RNG::UNIFORM, 0, 256);
      const cv::Size half((w + 1) / 2, (h + 1) / 2), twice(2 * w, 2 * h);
      cv::Mat cvDown, cvUp;
      cv::pyrDown(src, cvDown, half);
      cv::pyrUp(src, cvUp, twice);
      cv::Mat down = runOurs(src, half, true, [&](const cv::Mat& s, cv::Mat& d, Zel8u* b) {
        auto fn = ch == 1 ? zeliPyrDown_Gauss5x5_8u_C1R : zeliPyrDown_Gauss5x5_8u_C3R;
        return fn(s.ptr<Zel8u>(), int(s.step), d.ptr<Zel8u>(), int(d.step), {w, h}, b);
      });
      cv::Mat up = runOurs(src, twice, false, [&](const cv::Mat& s, cv::Mat& d, Zel8u* b) {
        auto fn = ch == 1 ? zeliPyrUp_Gauss5x5_8u_C1R : zeliPyrUp_Gauss5x5_8u_C3R;
        return fn(s.ptr<Zel8u>(), int(s.step), d.ptr<Zel8u>(), int(d.step), {w, h}, b);
      });
      EXPECT_EQ(cv::norm(down, cvDown, cv::NORM_INF), 0.0);
      EXPECT_EQ(cv::norm(up, cvUp, cv::NORM_INF), 0.0);
    }
  }
}

TEST(PyramidConformity, FloatLevelsAgreeToRounding) {
  cv::RNG rng(6);
  for (int trial = 0; trial < 20; ++trial) {
    const int w = rng.uniform(3, 300), h = rng.uniform(3, 200);
    SCOPED_TRACE(testing::Message() << w << " x " << h);
    cv::Mat src(h, w, CV_32FC1);
    rng.fill(src, cv::RNG::UNIFORM, -100.0, 100.0);
    const cv::Size half((w + 1) / 2, (h + 1) / 2), twice(2 * w, 2 * h);
    cv::Mat cvDown, cvUp;
    cv::pyrDown(src, cvDown, half);
    cv::pyrUp(src, cvUp, twice);
    cv::Mat down = runOurs(src, half, true, [&](const cv::Mat& s, cv::Mat& d, Zel8u* b) {
      return zeliPyrDown_Gauss5x5_32f_C1R(s.ptr<Zel32f>(), int(s.step), d.ptr<Zel32f>(), int(d.step), {w, h}, b);
    });
    cv::Mat up = runOurs(src, twice, false, [&](const cv::Mat& s, cv::Mat& d, Zel8u* b) {
      return zeliPyrUp_Gauss5x5_32f_C1R(s.ptr<Zel32f>(), int(s.step), d.ptr<Zel32f>(), int(d.step), {w, h}, b);
    });
    EXPECT_LE(cv::norm(down, cvDown, cv::NORM_INF), 1e-4);
    EXPECT_LE(cv::norm(up, cvUp, cv::NORM_INF), 1e-4);
  }
}

}  // namespace
