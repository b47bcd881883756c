// Tracking against cv::calcOpticalFlowPyrLK on the same pyramids (built by
// our Gaussian reductions, which match cv::pyrDown exactly for 8-bit
// images). The two trackers share the model (Scharr derivatives, bilinear
// windows, the 2 x 2 system, the same stopping threshold) but differ in
// fixed-point details and in the edges: OpenCV pads its levels, we cut the
// windows to the image. On points both keep, the positions agree closely.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <vector>

#include <opencv2/imgproc.hpp>
#include <opencv2/video/tracking.hpp>

#include "zelcv.h"

namespace {

struct Pyramid {
  ZeliPyramid* rec = nullptr;
  std::vector<cv::Mat> levels;  // each a view into a padded block, as OpenCV wants them
};

// Levels 0 .. top of `image` by zeliPyrDown_Gauss5x5_8u_C1R, each inside a
// border of `pad` reflected pixels.
void build(const cv::Mat& image, int top, int pad, Pyramid* p) {
  ASSERT_EQ(zeliPyramidInitAlloc(&p->rec, top, {image.cols, image.rows}, 2.0f), zelStatusOk);
  cv::Mat current = image;
  for (int l = 0; l <= p->rec->level; ++l) {
    if (l > 0) {
      const ZeliSize s = p->rec->roiSizes[l];
      cv::Mat next(s.height, s.width, CV_8UC1);
      int bytes = 0;
      zeliPyrDownGetBufSize_Gauss5x5(current.cols, zel8u, 1, &bytes);
      std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
      ASSERT_EQ(zeliPyrDown_Gauss5x5_8u_C1R(current.ptr<Zel8u>(), int(current.step), next.ptr<Zel8u>(),
                                            int(next.step), {current.cols, current.rows}, buffer.data()),
                zelStatusOk);
      current = next;
    }
    cv::Mat padded;
    cv::copyMakeBorder(current, padded, pad, pad, pad, pad, cv::BORDER_REFLECT_101);
    cv::Mat view = padded(cv::Rect(pad, pad, current.cols, current.rows));
    p->levels.push_back(view);
    p->rec->images[l] = view.ptr<Zel8u>();
    p->rec->steps[l] = int(view.step);
  }
}

cv::Mat texture(int w, int h, uint64_t seed) {
  cv::RNG rng(seed);
  cv::Mat noise(h / 8 + 2, w / 8 + 2, CV_32FC1);
  rng.fill(noise, cv::RNG::UNIFORM, 0.0, 255.0);
  cv::Mat big, out;
  cv::resize(noise, big, cv::Size(w, h), 0, 0, cv::INTER_CUBIC);
  cv::Mat fine(h, w, CV_32FC1);
  rng.fill(fine, cv::RNG::NORMAL, 0.0, 6.0);
  cv::GaussianBlur(fine, fine, cv::Size(3, 3), 0.8);
  big += fine;
  big.convertTo(out, CV_8UC1);
  return out;
}

TEST(OpticalFlowConformity, PositionsAgreeWithOpenCV) {
  const int win = 21, top = 3;
  for (int trial = 0; trial < 4; ++trial) {
    const int w = trial % 2 ? 640 : 320, h = trial % 2 ? 480 : 240;
    cv::Mat first = texture(w, h, 11 + trial);
    // A translation with a slight rotation, about the centre.
    const double angle = 0.4 * trial, dx = 3.7 - 2.1 * trial, dy = -2.3 + 1.6 * trial;
    cv::Mat m = cv::getRotationMatrix2D(cv::Point2f(w / 2.0f, h / 2.0f), angle, 1.0);
    m.at<double>(0, 2) += dx;
    m.at<double>(1, 2) += dy;
    cv::Mat second;
    cv::warpAffine(first, second, m, first.size(), cv::INTER_LINEAR, cv::BORDER_REFLECT_101);

    std::vector<cv::Point2f> corners;
    cv::goodFeaturesToTrack(first, corners, 500, 0.01, 5);
    ASSERT_GT(corners.size(), 100u);

    Pyramid a, b;
    build(first, top, win + 1, &a);
    build(second, top, win + 1, &b);

    std::vector<cv::Point2f> cvNext;
    std::vector<uchar> cvStatus;
    std::vector<float> cvErr;
    cv::calcOpticalFlowPyrLK(a.levels, b.levels, corners, cvNext, cvStatus, cvErr, cv::Size(win, win), top,
                             cv::TermCriteria(cv::TermCriteria::COUNT | cv::TermCriteria::EPS, 30, 0.01));

    const int n = int(corners.size());
    std::vector<ZeliPoint_32f> prev(static_cast<size_t>(n)), next(static_cast<size_t>(n));
    for (int i = 0; i < n; ++i) prev[size_t(i)] = next[size_t(i)] = {corners[size_t(i)].x, corners[size_t(i)].y};
    std::vector<Zel8s> status(static_cast<size_t>(n));
    std::vector<Zel32f> error(static_cast<size_t>(n));
    ZeliOptFlowPyrLKState* state = nullptr;
    ASSERT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&state, {w, h}, win, 0), zelStatusOk);
    ASSERT_EQ(zeliOpticalFlowPyrLK_8u_C1R(a.rec, b.rec, prev.data(), next.data(), status.data(), error.data(), n,
                                          win, top, 30, 0.01f, state),
              zelStatusOk);
    zeliOpticalFlowPyrLKFree_8u_C1R(state);

    // Windows that reach the image's edge at level 0 are read differently
    // (OpenCV's padding against our cut windows): compare the others.
    const float margin = win / 2 + 2;
    auto inner = [&](float x, float y) { return x >= margin && y >= margin && x < w - margin && y < h - margin; };
    int shared = 0, close = 0, inside = 0;
    double worst = 0;
    for (int i = 0; i < n; ++i) {
      if (!cvStatus[size_t(i)] || status[size_t(i)] != 0) continue;
      ++shared;
      if (!inner(corners[size_t(i)].x, corners[size_t(i)].y) || !inner(cvNext[size_t(i)].x, cvNext[size_t(i)].y))
        continue;
      ++inside;
      const double d = std::max(std::fabs(cvNext[size_t(i)].x - next[size_t(i)].x),
                                std::fabs(cvNext[size_t(i)].y - next[size_t(i)].y));
      worst = std::max(worst, d);
      close += d <= 0.01;
    }
    SCOPED_TRACE(testing::Message() << "trial " << trial << ": " << shared << " shared of " << n << ", "
                                    << inside << " inside, worst " << worst);
    std::printf("trial %d: %d of %d points kept by both, %d inside, largest difference %.4f pixel\n", trial, shared,
                n, inside, worst);
    EXPECT_GT(shared, n * 9 / 10);
    EXPECT_GT(inside, n * 3 / 4);
    EXPECT_EQ(close, inside);
    zeliPyramidFree(a.rec);
    zeliPyramidFree(b.rec);
  }
}

}  // namespace
