// Lens undistortion against cv::undistort, cv::initUndistortRectifyMap and
// cv::remap (bilinear, constant border 0). Both quantise positions to 1/32
// pixel, and OpenCV's 15-bit weights are ours times 32, so resampling one map
// gives the same 8-bit pixels and the same float pixels. The camera model is
// evaluated in single precision here and in double precision there: positions
// agree to about 1e-4 pixel, and where a position sits on a 1/64 tie the two
// quantisations may fall one step apart. On pictures whose neighbouring pixels
// differ by at most G, that moves a result by at most G / 32 (plus the
// rounding of 8-bit results); the pictures here fade to 0 at their edges,
// where the constant border takes over.
#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include <opencv2/calib3d.hpp>
#include <opencv2/imgproc.hpp>

#include "zelcv.h"

namespace {

// A smooth picture in [0, 250], zero at its edges; neighbouring pixels differ
// by at most about 6 (G = 8 is a safe bound for the sizes used).
cv::Mat smoothPicture(int w, int h, int type, double phase) {
  cv::Mat m(h, w, type);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      const double wx = std::sin(CV_PI * x / (w - 1)), wy = std::sin(CV_PI * y / (h - 1));
      const double v = 125.0 * wx * wy * (1.0 + 0.9 * std::sin(x * 0.05 + phase) * std::cos(y * 0.04 - phase));
      for (int c = 0; c < m.channels(); ++c) {
        const double vc = v * (1.0 - 0.1 * c);
        if (m.depth() == CV_8U)
          m.ptr<uchar>(y)[x * m.channels() + c] = cv::saturate_cast<uchar>(vc);
        else
          m.ptr<float>(y)[x * m.channels() + c] = float(vc);
      }
    }
  return m;
}

struct Lens {
  float fx, fy, cx, cy, k1, k2, p1, p2;
  cv::Mat camera() const { return (cv::Mat_<double>(3, 3) << fx, 0, cx, 0, fy, cy, 0, 0, 1); }
  cv::Mat coefficients() const { return (cv::Mat_<double>(1, 4) << k1, k2, p1, p2); }
};

const Lens kLenses[] = {{520.0f, 515.0f, 318.5f, 241.0f, -0.28f, 0.07f, 0.001f, -0.0008f},  // barrel
                        {610.0f, 600.0f, 330.0f, 235.0f, 0.18f, -0.05f, -0.002f, 0.0015f},  // pincushion
                        {400.0f, 400.0f, 300.0f, 250.0f, 0.0f, 0.0f, 0.01f, 0.01f}};        // tangential only

ZelStatus ourUndistort(const cv::Mat& src, cv::Mat& dst, const Lens& l) {
  int bytes = 0;
  EXPECT_EQ(zeliUndistortGetSize({src.cols, src.rows}, &bytes), zelStatusOk);
  std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
  dst.create(src.size(), src.type());
  const ZeliSize roi{src.cols, src.rows};
  const int ss = int(src.step), ds = int(dst.step);
  switch (src.type()) {
    case CV_8UC1:
      return zeliUndistortRadial_8u_C1R(src.ptr<Zel8u>(), ss, dst.ptr<Zel8u>(), ds, roi, l.fx, l.fy, l.cx, l.cy, l.k1,
                                        l.k2, l.p1, l.p2, buffer.data());
    case CV_8UC3:
      return zeliUndistortRadial_8u_C3R(src.ptr<Zel8u>(), ss, dst.ptr<Zel8u>(), ds, roi, l.fx, l.fy, l.cx, l.cy, l.k1,
                                        l.k2, l.p1, l.p2, buffer.data());
    case CV_32FC1:
      return zeliUndistortRadial_32f_C1R(src.ptr<Zel32f>(), ss, dst.ptr<Zel32f>(), ds, roi, l.fx, l.fy, l.cx, l.cy,
                                         l.k1, l.k2, l.p1, l.p2, buffer.data());
    default:
      return zeliUndistortRadial_32f_C3R(src.ptr<Zel32f>(), ss, dst.ptr<Zel32f>(), ds, roi, l.fx, l.fy, l.cx, l.cy,
                                         l.k1, l.k2, l.p1, l.p2, buffer.data());
  }
}

ZelStatus ourRemap(const cv::Mat& src, const cv::Mat& mx, const cv::Mat& my, cv::Mat& dst) {
  dst.create(mx.size(), src.type());
  const ZeliSize srcSize{src.cols, src.rows}, roi{mx.cols, mx.rows};
  const int ss = int(src.step), xs = int(mx.step), ys = int(my.step), ds = int(dst.step);
  const float* x = mx.ptr<float>();
  const float* y = my.ptr<float>();
  switch (src.type()) {
    case CV_8UC1:
      return zeliRemapBilinear_8u_C1R(src.ptr<Zel8u>(), ss, srcSize, x, xs, y, ys, dst.ptr<Zel8u>(), ds, roi);
    case CV_8UC3:
      return zeliRemapBilinear_8u_C3R(src.ptr<Zel8u>(), ss, srcSize, x, xs, y, ys, dst.ptr<Zel8u>(), ds, roi);
    case CV_32FC1:
      return zeliRemapBilinear_32f_C1R(src.ptr<Zel32f>(), ss, srcSize, x, xs, y, ys, dst.ptr<Zel32f>(), ds, roi);
    default:
      return zeliRemapBilinear_32f_C3R(src.ptr<Zel32f>(), ss, srcSize, x, xs, y, ys, dst.ptr<Zel32f>(), ds, roi);
  }
}

const int kTypes[] = {CV_8UC1, CV_8UC3, CV_32FC1, CV_32FC3};

// Tolerance for one 1/32-pixel step of a position on a picture whose
// neighbours differ by at most 8: one grey level for 8u.
double tolerance(int type) { return CV_MAT_DEPTH(type) == CV_8U ? 1.0 : 8.0 / 32.0 + 1e-3; }

TEST(UndistortConformity, ResamplingOneMapMatchesRemap) {
  cv::RNG rng(11);
  for (int trial = 0; trial < 12; ++trial) {
    for (int type : kTypes) {
      const int sw = rng.uniform(1, 200), sh = rng.uniform(1, 120), dw = rng.uniform(1, 230), dh = rng.uniform(1, 90);
      SCOPED_TRACE(testing::Message() << "type " << type << " source " << sw << "x" << sh << " map " << dw << "x" << dh);
      cv::Mat src(sh, sw, type);
      if (CV_MAT_DEPTH(type) == CV_8U)
        rng.fill(src, cv::RNG::UNIFORM, 0, 256);
      else
        rng.fill(src, cv::RNG::UNIFORM, -50.0, 250.0);
      cv::Mat mx(dh, dw, CV_32FC1), my(dh, dw, CV_32FC1);
      rng.fill(mx, cv::RNG::UNIFORM, -3.0, sw + 3.0);
      rng.fill(my, cv::RNG::UNIFORM, -3.0, sh + 3.0);
      cv::Mat theirs, ours;
      cv::remap(src, theirs, mx, my, cv::INTER_LINEAR, cv::BORDER_CONSTANT, cv::Scalar::all(0));
      ASSERT_EQ(ourRemap(src, mx, my, ours), zelStatusOk);
      // Random pixels, not smooth ones: the same quantised position gives the
      // same result.
      if (CV_MAT_DEPTH(type) == CV_8U)
        EXPECT_EQ(cv::norm(ours, theirs, cv::NORM_INF), 0.0);
      else
        EXPECT_LE(cv::norm(ours, theirs, cv::NORM_INF), 1e-4);
    }
  }
}

TEST(UndistortConformity, ImagesMatchUndistort) {
  for (const Lens& lens : kLenses)
    for (int type : kTypes)
      for (cv::Size size : {cv::Size(640, 480), cv::Size(97, 61)}) {
        SCOPED_TRACE(testing::Message() << "type " << type << " " << size.width << "x" << size.height << " k1 "
                                        << lens.k1);
        Lens l = lens;
        l.cx *= size.width / 640.0f;
        l.cy *= size.height / 480.0f;
        l.fx *= size.width / 640.0f;
        l.fy *= size.height / 480.0f;
        const cv::Mat src = smoothPicture(size.width, size.height, type, 0.3);
        cv::Mat theirs, ours;
        cv::undistort(src, theirs, l.camera(), l.coefficients());
        ASSERT_EQ(ourUndistort(src, ours, l), zelStatusOk);
        EXPECT_LE(cv::norm(ours, theirs, cv::NORM_INF), tolerance(type));
      }
}

TEST(UndistortConformity, MapsMatchInitUndistortRectifyMap) {
  for (const Lens& l : kLenses) {
    const cv::Size size(640, 480);
    cv::Mat cvx, cvy;
    cv::initUndistortRectifyMap(l.camera(), l.coefficients(), cv::Mat(), l.camera(), size, CV_32FC1, cvx, cvy);
    cv::Mat mx(size, CV_32FC1), my(size, CV_32FC1);
    const Zel32f camera[4] = {l.fx, l.fy, l.cx, l.cy}, coefficients[4] = {l.k1, l.k2, l.p1, l.p2};
    ASSERT_EQ(zeliCreateMapCameraUndistort_32f_C1R(mx.ptr<Zel32f>(), int(mx.step), my.ptr<Zel32f>(), int(my.step),
                                                   {size.width, size.height}, camera, coefficients),
              zelStatusOk);
    // Single against double precision, on coordinates up to a few hundred.
    EXPECT_LE(cv::norm(mx, cvx, cv::NORM_INF), 2e-3);
    EXPECT_LE(cv::norm(my, cvy, cv::NORM_INF), 2e-3);
    for (int type : kTypes) {
      SCOPED_TRACE(testing::Message() << "type " << type << " k1 " << l.k1);
      const cv::Mat src = smoothPicture(size.width, size.height, type, 1.1);
      cv::Mat theirs, ours;
      cv::remap(src, theirs, cvx, cvy, cv::INTER_LINEAR, cv::BORDER_CONSTANT, cv::Scalar::all(0));
      ASSERT_EQ(ourRemap(src, mx, my, ours), zelStatusOk);
      EXPECT_LE(cv::norm(ours, theirs, cv::NORM_INF), tolerance(type));
    }
  }
}

TEST(UndistortConformity, ZeroCoefficientsCopyLikeUndistort) {
  const Lens l{300.0f, 310.0f, 150.0f, 100.0f, 0, 0, 0, 0};
  for (int type : kTypes) {
    cv::Mat src(200, 300, type);
    cv::RNG rng(3);
    rng.fill(src, cv::RNG::UNIFORM, 0, 256);
    cv::Mat theirs, ours;
    cv::undistort(src, theirs, l.camera(), l.coefficients());
    ASSERT_EQ(ourUndistort(src, ours, l), zelStatusOk);
    EXPECT_EQ(cv::norm(ours, src, cv::NORM_INF), 0.0);
    EXPECT_EQ(cv::norm(theirs, src, cv::NORM_INF), 0.0);
  }
}

}  // namespace
