// Corner measures, FAST and Hough lines against OpenCV:
// - cv::cornerMinEigenVal, cv::cornerHarris, cv::cornerEigenValsAndVecs: the
//   same derivative scale, products, block sums and formulas; OpenCV sums the
//   block in another order, so values agree to a small fraction of the
//   image's largest response, not bit for bit. The constant border is
//   compared with a border value of 0 (OpenCV's).
// - cv::FAST: the same corner sets and scores (its response) for the
//   16-pixel circle with arc 9, with and without suppression, away from the
//   3-pixel band where OpenCV never looks; for the 12- and 8-pixel circles
//   OpenCV's corners are a subset of ours (its quick rejection misses some).
// - cv::HoughLines: the same lines on synthetic line images (as sets: the
//   order of equally voted lines is ours).
// - cv::HoughLinesP: both find the segments drawn in a synthetic image.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <opencv2/features2d.hpp>
#include <opencv2/imgproc.hpp>
#include <random>
#include <set>
#include <tuple>
#include <vector>

#include "zelcv.h"

namespace {

struct BorderPair {
  int ours, cv;
};
const BorderPair kBorders[] = {{zelBorderConstant, cv::BORDER_CONSTANT},
                               {zelBorderReplicate, cv::BORDER_REPLICATE},
                               {zelBorderMirror, cv::BORDER_REFLECT_101},
                               {zelBorderMirrorWithEdge, cv::BORDER_REFLECT}};

cv::Mat scene(std::mt19937& rng, int w, int h) {
  cv::Mat m(h, w, CV_8UC1, cv::Scalar(40));
  for (int i = 0; i < 12; ++i) {
    const cv::Point a(int(rng() % w), int(rng() % h)), b(int(rng() % w), int(rng() % h));
    cv::rectangle(m, a, b, cv::Scalar(double(rng() % 256)), rng() % 2 ? -1 : 2);
  }
  cv::Mat noise(h, w, CV_8UC1);
  cv::randu(noise, 0, 12);
  return m + noise;
}

enum class Which { kMinEigen, kHarris, kEigen };

void compareCorners(Which which, bool floatSource) {
  std::mt19937 rng(floatSource ? 5 : 4);
  for (int round = 0; round < 24; ++round) {
    const int w = 20 + int(rng() % 90), h = 15 + int(rng() % 70);
    cv::Mat src8 = scene(rng, w, h), src32;
    src8.convertTo(src32, CV_32F, 1.0 / 255);
    const BorderPair border = kBorders[round % 4];
    const int kind = round % 3;  // Sobel 3x3, Sobel 5x5, Scharr
    const int filter = kind == 2 ? zelFilterScharr : zelFilterSobel;
    const int mask = kind == 1 ? zelMaskSize5x5 : zelMaskSize3x3;
    const int ksize = kind == 2 ? -1 : kind == 1 ? 5 : 3;
    const int block = 2 + int(rng() % 5);
    const float k = 0.04f;
    const int per = which == Which::kEigen ? 6 : 1;
    cv::Mat expected;
    const cv::Mat& src = floatSource ? src32 : src8;
    if (which == Which::kMinEigen) cv::cornerMinEigenVal(src, expected, block, ksize, border.cv);
    else if (which == Which::kHarris) cv::cornerHarris(src, expected, block, ksize, k, border.cv);
    else cv::cornerEigenValsAndVecs(src, expected, block, ksize, border.cv);
    cv::Mat got(h, w, per == 6 ? CV_32FC(6) : CV_32FC1);
    int bytes = 0;
    ASSERT_EQ(zeliHarrisCornerGetBufferSize({w, h}, mask, block, &bytes), zelStatusOk);
    std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
    const int sstep = int(src.step), dstep = int(got.step);
    ZelStatus s;
    Zel32f* out = got.ptr<Zel32f>();
    if (!floatSource) {
      const Zel8u* in = src8.ptr<Zel8u>();
      s = which == Which::kMinEigen ? zeliMinEigenVal_8u32f_C1R(in, sstep, out, dstep, {w, h}, filter, mask, block,
                                                               border.ours, 0, buffer.data())
          : which == Which::kHarris ? zeliHarrisCorner_8u32f_C1R(in, sstep, out, dstep, {w, h}, filter, mask, block, k,
                                                                 border.ours, 0, buffer.data())
                                    : zeliEigenValsVecs_8u32f_C1R(in, sstep, out, dstep, {w, h}, filter, mask, block,
                                                                  border.ours, 0, buffer.data());
    } else {
      const Zel32f* in = src32.ptr<Zel32f>();
      s = which == Which::kMinEigen ? zeliMinEigenVal_32f_C1R(in, sstep, out, dstep, {w, h}, filter, mask, block,
                                                             border.ours, 0.0f, buffer.data())
          : which == Which::kHarris ? zeliHarrisCorner_32f_C1R(in, sstep, out, dstep, {w, h}, filter, mask, block, k,
                                                               border.ours, 0.0f, buffer.data())
                                    : zeliEigenValsVecs_32f_C1R(in, sstep, out, dstep, {w, h}, filter, mask, block,
                                                                border.ours, 0.0f, buffer.data());
    }
    ASSERT_EQ(s, zelStatusOk);
    double largest = 0.0;
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w * per; ++x)
        if (per == 1 || x % 6 < 2) largest = std::max(largest, std::fabs(double(expected.ptr<float>(y)[x])));
    const double tolerance = 2e-5 * largest + 1e-9;
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        const float* e = expected.ptr<float>(y) + x * per;
        const float* g = got.ptr<float>(y) + x * per;
        for (int c = 0; c < std::min(per, 2); ++c)
          ASSERT_NEAR(g[c], e[c], tolerance) << "round " << round << " x=" << x << " y=" << y << " c=" << c;
        if (per == 6 && e[0] - e[1] > 1e-3 * largest) {
          // Clearly distinct eigenvalues: the same unit vectors, up to sign.
          for (int v = 0; v < 2; ++v) {
            const double dot = double(g[2 + 2 * v]) * e[2 + 2 * v] + double(g[3 + 2 * v]) * e[3 + 2 * v];
            ASSERT_NEAR(std::fabs(dot), 1.0, 1e-3) << "round " << round << " x=" << x << " y=" << y;
          }
        }
      }
  }
}

TEST(FeaturesCv, MinEigenVal) {
  compareCorners(Which::kMinEigen, false);
  compareCorners(Which::kMinEigen, true);
}
TEST(FeaturesCv, Harris) {
  compareCorners(Which::kHarris, false);
  compareCorners(Which::kHarris, true);
}
TEST(FeaturesCv, EigenValsVecs) {
  compareCorners(Which::kEigen, false);
  compareCorners(Which::kEigen, true);
}

TEST(FeaturesCv, Fast) {
  std::mt19937 rng(6);
  int stateBytes = 0;
  ASSERT_EQ(zeliFastNGetSize(&stateBytes), zelStatusOk);
  struct Type {
    int radius, arc, cv;
  };
  const Type types[] = {{3, 9, cv::FastFeatureDetector::TYPE_9_16},
                        {2, 7, cv::FastFeatureDetector::TYPE_7_12},
                        {1, 5, cv::FastFeatureDetector::TYPE_5_8}};
  size_t total = 0;
  for (int round = 0; round < 30; ++round) {
    const int w = 30 + int(rng() % 200), h = 20 + int(rng() % 120);
    cv::Mat src = scene(rng, w, h);
    cv::GaussianBlur(src, src, cv::Size(3, 3), 0.8);
    const Type type = types[round % 3];
    const int threshold = 5 + int(rng() % 30);
    // Only the 16-pixel circle is compared with suppression: for the smaller
    // circles OpenCV's quick rejection drops some true corners (it tests
    // pixels that are not opposite on those circles), which changes who
    // suppresses whom.
    const bool suppress = type.radius == 3 && round % 2;
    std::vector<cv::KeyPoint> keypoints;
    cv::FAST(src, keypoints, threshold, suppress, static_cast<cv::FastFeatureDetector::DetectorType>(type.cv));
    std::vector<Zel8u> state(static_cast<size_t>(stateBytes));
    auto* st = reinterpret_cast<ZeliFastNState*>(state.data());
    ASSERT_EQ(zeliFastNInit(type.radius, type.arc, threshold, suppress, st), zelStatusOk);
    int bytes = 0;
    ASSERT_EQ(zeliFastNGetBufferSize({w, h}, &bytes), zelStatusOk);
    std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
    cv::Mat corner(h, w, CV_8UC1), score(h, w, CV_8UC1);
    ASSERT_EQ(zeliFastN_8u_C1R(src.data, int(src.step), corner.data, int(corner.step), score.data, int(score.step),
                               {w, h}, st, buffer.data()),
              zelStatusOk);
    // Inside the band both look at, and one pixel further in where
    // suppression sees the same neighbours.
    const int band = 3 + (suppress ? 1 : 0);
    auto inside = [&](int x, int y) { return x >= band && y >= band && x < w - band && y < h - band; };
    std::set<std::tuple<int, int, int>> theirs, ours;
    for (const cv::KeyPoint& k : keypoints) {
      const int x = int(k.pt.x), y = int(k.pt.y);
      if (inside(x, y)) theirs.insert({x, y, suppress ? int(k.response) : 0});
    }
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x)
        if (corner.at<Zel8u>(y, x) && inside(x, y)) ours.insert({x, y, suppress ? int(score.at<Zel8u>(y, x)) : 0});
    if (type.radius == 3) {
      ASSERT_EQ(ours, theirs) << "round " << round << " t " << threshold;
    } else {
      // Every corner OpenCV reports is ours (it misses many on these circles).
      for (const auto& c : theirs) ASSERT_TRUE(ours.count(c)) << "round " << round << " radius " << type.radius;
    }
    total += ours.size();
  }
  EXPECT_GT(total, 300u);
}

TEST(FeaturesCv, HoughLines) {
  std::mt19937 rng(7);
  for (int round = 0; round < 20; ++round) {
    const int w = 60 + int(rng() % 200), h = 40 + int(rng() % 150);
    cv::Mat src(h, w, CV_8UC1, cv::Scalar(0));
    for (int l = 0; l < 4; ++l)
      cv::line(src, {int(rng() % (w / 4)), int(rng() % h)}, {w - 1 - int(rng() % (w / 4)), int(rng() % h)},
               cv::Scalar(255));
    const float drho = 1.0f + float(rng() % 3) * 0.5f;
    const float dtheta = float(CV_PI / double(90 + rng() % 120));
    const int threshold = 10 + int(rng() % 20);
    std::vector<cv::Vec2f> theirs;
    cv::HoughLines(src, theirs, drho, dtheta, threshold);
    int bytes = 0;
    ASSERT_EQ(zeliHoughLineGetSize_8u_C1R({w, h}, {drho, dtheta}, &bytes), zelStatusOk);
    std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
    std::vector<ZeliPoint_32f> lines(4096);
    int count = 0;
    ASSERT_EQ(zeliHoughLine_8u32f_C1R(src.data, int(src.step), {w, h}, {drho, dtheta}, threshold, lines.data(),
                                      int(lines.size()), &count, buffer.data()),
              zelStatusOk);
    std::multiset<std::pair<float, float>> a, b;
    for (const cv::Vec2f& l : theirs) a.insert({l[0], l[1]});
    for (int i = 0; i < count; ++i) b.insert({lines[i].x, lines[i].y});
    if (a != b) {
      for (auto& l : a) if (!b.count(l)) ADD_FAILURE() << "theirs only " << l.first << " " << l.second;
      for (auto& l : b) if (!a.count(l)) ADD_FAILURE() << "ours only " << l.first << " " << l.second;
    }
    ASSERT_EQ(a, b) << "round " << round << " drho " << drho << " dtheta " << dtheta;
    ASSERT_GT(count, 0);
  }
}

TEST(FeaturesCv, HoughLinesProbabilistic) {
  std::mt19937 rng(8);
  for (int round = 0; round < 10; ++round) {
    const int w = 160 + int(rng() % 100), h = 120 + int(rng() % 80);
    cv::Mat src(h, w, CV_8UC1, cv::Scalar(0));
    // Horizontal, vertical and diagonal, so that the rasterised lines have no
    // steps a gap could break.
    const int y0 = 80 + int(rng() % 30), x0 = 100 + int(rng() % 50);
    const std::vector<std::pair<cv::Point, cv::Point>> drawn = {
        {{5, y0}, {w - 6, y0}}, {{x0, h - 5}, {x0, 5}}, {{10, 10}, {70, 70}}};
    for (const auto& d : drawn) cv::line(src, d.first, d.second, cv::Scalar(255));
    std::vector<cv::Vec4i> theirs;
    const double theta = CV_PI / 180;
    cv::HoughLinesP(src, theirs, 1, theta, 30, 40, 3);
    int bytes = 0;
    ASSERT_EQ(zeliHoughProbLineGetSize_8u_C1R({w, h}, {1.0f, float(theta)}, &bytes), zelStatusOk);
    std::vector<Zel8u> state(static_cast<size_t>(bytes));
    auto* st = reinterpret_cast<ZeliHoughProbState*>(state.data());
    ASSERT_EQ(zeliHoughProbLineInit_8u32f_C1R({w, h}, {1.0f, float(theta)}, unsigned(round), st), zelStatusOk);
    std::vector<ZeliPoint> points(200);
    int count = 0;
    ASSERT_EQ(zeliHoughProbLine_8u32f_C1R(src.data, int(src.step), {w, h}, 30, 40, 3, points.data(), 100, &count, st),
              zelStatusOk);
    auto near = [](cv::Point p, int x, int y) { return std::abs(p.x - x) <= 3 && std::abs(p.y - y) <= 3; };
    for (const auto& d : drawn) {
      bool inOurs = false, inTheirs = false;
      for (int i = 0; i < count; ++i) {
        const ZeliPoint a = points[2 * i], b = points[2 * i + 1];
        inOurs = inOurs || (near(d.first, a.x, a.y) && near(d.second, b.x, b.y)) ||
                 (near(d.first, b.x, b.y) && near(d.second, a.x, a.y));
      }
      for (const cv::Vec4i& l : theirs)
        inTheirs = inTheirs || (near(d.first, l[0], l[1]) && near(d.second, l[2], l[3])) ||
                   (near(d.first, l[2], l[3]) && near(d.second, l[0], l[1]));
      EXPECT_TRUE(inOurs) << "round " << round << " " << d.first << d.second;
      if (!inOurs)
        for (int i = 0; i < count; ++i)
          ADD_FAILURE() << points[2 * i].x << "," << points[2 * i].y << " " << points[2 * i + 1].x << ","
                        << points[2 * i + 1].y;
      if (!inTheirs)
        for (const cv::Vec4i& l : theirs) ADD_FAILURE() << "theirs " << l;
      EXPECT_TRUE(inTheirs) << "round " << round;
    }
  }
}

}  // namespace
