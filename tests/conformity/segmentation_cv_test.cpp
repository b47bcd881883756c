// Agreement with OpenCV where the definitions coincide: connected components
// of a binary image (the same partition), speckle filtering (the same
// pixels), watershed basins on plateau-free reliefs (the same basin away
// from the lines where basins meet) and fast-marching inpainting of smooth
// pictures (within a stated tolerance).
#include <gtest/gtest.h>

#include <opencv2/calib3d.hpp>
#include <opencv2/imgproc.hpp>
#include <opencv2/photo.hpp>

#include <map>
#include <random>
#include <vector>

#include "zelcv.h"

namespace {

cv::Mat randomBinary(std::mt19937& rng, int w, int h, int density) {
  cv::Mat m(h, w, CV_8UC1, cv::Scalar(0));
  for (int i = 0; i < w * h * density / 100; ++i)
    cv::circle(m, {int(rng() % w), int(rng() % h)}, int(rng() % 4), cv::Scalar(255), cv::FILLED);
  return m;
}

TEST(Segmentation, LabelsGiveTheSamePartitionAsConnectedComponents) {
  std::mt19937 rng(1);
  for (int i = 0; i < 40; ++i) {
    const int w = 1 + int(rng() % 200), h = 1 + int(rng() % 150), conn = rng() % 2 ? 8 : 4;
    cv::Mat src = randomBinary(rng, w, h, 1 + int(rng() % 4));
    cv::Mat theirs;
    const int n = cv::connectedComponents(src, theirs, conn, CV_32S);
    cv::Mat ours(h, w, CV_32SC1);
    int bytes = 0, num = 0;
    ASSERT_EQ(zeliLabelMarkersGetBufferSize_8u32s_C1R({w, h}, &bytes), 0);
    std::vector<Zel8u> buf(static_cast<size_t>(bytes));
    ASSERT_EQ(zeliLabelMarkers_8u32s_C1R(src.data, int(src.step), ours.ptr<Zel32s>(), int(ours.step), {w, h}, 1,
                                         1 << 30, conn == 8 ? zelNormInf : zelNormL1, &num, buf.data()),
              0);
    EXPECT_EQ(num, n - 1);  // OpenCV counts the background
    // A bijection between the labels: each of ours maps to one of theirs and
    // back.
    std::map<int, int> forward, backward;
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        const int a = ours.at<int>(y, x), b = theirs.at<int>(y, x);
        ASSERT_EQ(a == 0, b == 0);
        ASSERT_EQ(forward.emplace(a, b).first->second, b);
        ASSERT_EQ(backward.emplace(b, a).first->second, a);
      }
  }
}

template <typename T>
void speckles(int cvType, ZelStatus (*fn)(T*, int, ZeliSize, T, int, T, int, Zel8u*), ZelDataType type) {
  std::mt19937 rng(2);
  for (int i = 0; i < 30; ++i) {
    const int w = 1 + int(rng() % 160), h = 1 + int(rng() % 120);
    cv::Mat img(h, w, cvType);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) img.at<T>(y, x) = T((x / 9 + y / 7) % 5 * 20 + int(rng() % 4));
    const int maxSize = int(rng() % 60), diff = int(rng() % 3);
    const T newVal = T(rng() % 2 ? 0 : 40);
    cv::Mat theirs = img.clone(), ours = img.clone();
    cv::filterSpeckles(theirs, double(newVal), maxSize, double(diff));
    int bytes = 0;
    ASSERT_EQ(zeliMarkSpecklesGetBufferSize({w, h}, type, &bytes), 0);
    std::vector<Zel8u> buf(static_cast<size_t>(bytes));
    ASSERT_EQ(fn(ours.ptr<T>(), int(ours.step), {w, h}, newVal, maxSize, T(diff), zelNormInf, buf.data()), 0);
    ASSERT_EQ(cv::countNonZero(theirs != ours), 0) << w << " x " << h << " size " << maxSize << " diff " << diff;
  }
}

TEST(Segmentation, SpecklesMatchFilterSpeckles) {
  speckles<Zel8u>(CV_8UC1, zeliMarkSpeckles_8u_C1IR, zel8u);
  speckles<Zel16s>(CV_16SC1, zeliMarkSpeckles_16s_C1IR, zel16s);
}

// Cones around the seeds: each pixel's relief rises with its city-block
// distance to the nearest seed, so the relief has no plateau and OpenCV's
// colour-step flooding and our relief flooding both grow the basins by
// distance. Pixels within two of a line in either result are not compared.
TEST(Segmentation, WatershedBasinsMatchOnPlateauFreeReliefs) {
  std::mt19937 rng(3);
  for (int i = 0; i < 12; ++i) {
    const int w = 40 + int(rng() % 100), h = 40 + int(rng() % 80), seeds = 2 + int(rng() % 6);
    cv::Mat relief(h, w, CV_8UC1), ours(h, w, CV_8UC1, cv::Scalar(0));
    cv::Mat theirs(h, w, CV_32SC1, cv::Scalar(0));
    std::vector<cv::Point> at;
    for (int s = 0; s < seeds; ++s) {
      at.emplace_back(1 + int(rng() % (w - 2)), 1 + int(rng() % (h - 2)));
      ours.at<uint8_t>(at.back()) = uint8_t(s + 1);
      theirs.at<int>(at.back()) = s + 1;
    }
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        int d = 1 << 20;
        for (const cv::Point& p : at) d = std::min(d, std::abs(p.x - x) + std::abs(p.y - y));
        relief.at<uint8_t>(y, x) = uint8_t(std::min(255, d));
      }
    cv::Mat colour;
    cv::cvtColor(relief, colour, cv::COLOR_GRAY2BGR);
    cv::watershed(colour, theirs);
    int bytes = 0;
    ASSERT_EQ(zeliSegmentWatershedGetBufferSize_8u_C1R({w, h}, &bytes), 0);
    std::vector<Zel8u> buf(static_cast<size_t>(bytes));
    ASSERT_EQ(zeliSegmentWatershed_8u_C1IR(relief.data, int(relief.step), ours.data, int(ours.step), {w, h},
                                           zelNormL1, zelSegmentLines, buf.data()),
              0);
    auto nearLine = [&](int x, int y) {
      for (int dy = -2; dy <= 2; ++dy)
        for (int dx = -2; dx <= 2; ++dx) {
          const int xx = x + dx, yy = y + dy;
          if (xx < 1 || yy < 1 || xx >= w - 1 || yy >= h - 1) continue;  // OpenCV marks the frame
          if (ours.at<uint8_t>(yy, xx) == 255 || theirs.at<int>(yy, xx) == -1) return true;
        }
      return false;
    };
    int compared = 0;
    for (int y = 1; y < h - 1; ++y)
      for (int x = 1; x < w - 1; ++x) {
        if (nearLine(x, y)) continue;
        ++compared;
        ASSERT_EQ(int(ours.at<uint8_t>(y, x)), theirs.at<int>(y, x)) << "at " << x << ", " << y;
      }
    EXPECT_GT(compared, (w - 2) * (h - 2) / 2);
  }
}

// Smooth pictures with a scratch: both fills stay within 6 grey levels on
// average of each other, and no pixel outside the mask changes.
TEST(Segmentation, InpaintingIsCloseToFastMarchingInpaint) {
  std::mt19937 rng(4);
  for (int i = 0; i < 8; ++i) {
    const int w = 60 + int(rng() % 120), h = 50 + int(rng() % 80);
    const int ch = i % 2 ? 3 : 1;
    cv::Mat img(h, w, ch == 1 ? CV_8UC1 : CV_8UC3), mask(h, w, CV_8UC1, cv::Scalar(0));
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x)
        for (int c = 0; c < ch; ++c)
          img.ptr<uint8_t>(y)[x * ch + c] = uint8_t(128 + 100 * std::sin(0.05 * x + 0.03 * y + c));
    cv::line(mask, {int(rng() % w), 0}, {int(rng() % w), h - 1}, cv::Scalar(255), 1 + int(rng() % 4));
    const float radius = 3.0f + float(rng() % 4);
    cv::Mat theirs;
    cv::inpaint(img, mask, theirs, radius, cv::INPAINT_TELEA);
    cv::Mat ours(h, w, img.type());
    ZeliInpaintState* state = nullptr;
    ASSERT_EQ((ch == 1 ? zeliInpaintInitAlloc_8u_C1R : zeliInpaintInitAlloc_8u_C3R)(mask.data, int(mask.step),
                                                                                    {w, h}, radius, &state),
              0);
    ASSERT_EQ((ch == 1 ? zeliInpaint_8u_C1R : zeliInpaint_8u_C3R)(img.data, int(img.step), ours.data,
                                                                  int(ours.step), {w, h}, state),
              0);
    zeliInpaintFree_8u_C1R(state);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w * ch; ++x)
        if (!mask.at<uint8_t>(y, x / ch)) {
          ASSERT_EQ(ours.ptr<uint8_t>(y)[x], img.ptr<uint8_t>(y)[x]);
        }
    cv::Mat d;
    cv::absdiff(ours, theirs, d);
    const double meanDiff = cv::mean(d, mask)[0];
    EXPECT_LE(meanDiff, 6.0) << w << " x " << h << " C" << ch << " radius " << radius;
  }
}

}  // namespace
