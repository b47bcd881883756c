// Flood fill against cv::floodFill where the definitions coincide:
//   plain members = cv::floodFill with zero differences (no mask);
//   Range members = FLOODFILL_FIXED_RANGE with loDiff = minDelta, upDiff = maxDelta;
//   Grad members  = the floating range (each pixel against the filled
//                   neighbour it is reached from).
// Both report the area and the bounding rectangle. Where they differ, and
// what is therefore not compared: a seed already holding the new value (we
// return at once and write no record); images whose fill outgrows our stack
// (we stop, by design); a Range new value inside the interval (we count such
// pixels as filled, OpenCV uses a mask); 16u images (OpenCV has no 16-bit
// fill); 32f gradients with fractional values (our test is evaluated as
// |q + (minDelta - maxDelta) / 2 - p| <= (minDelta + maxDelta) / 2, which
// rounds differently), so the float images here hold small integers.
#include <gtest/gtest.h>

#include <functional>
#include <vector>

#include <opencv2/imgproc.hpp>

#include "zelcv.h"

namespace {


enum class Kind { Plain, Range, Grad };

// Blocks of a few levels (steps of 3) with noise of +-1, so that plain fills
// find flat blocks and range and gradient fills spread over several.
cv::Mat blockImage(cv::RNG& rng, int type, int w, int h) {
  cv::Mat m(h, w, type);
  const int channels = m.channels();
  cv::Mat levels(h / 4 + 1, w / 4 + 1, CV_MAKETYPE(CV_32S, channels));
  rng.fill(levels, cv::RNG::UNIFORM, 0, 4);
  const bool noisy = rng.uniform(0, 2) == 1;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      for (int c = 0; c < channels; ++c) {
        int v = 20 + 3 * levels.ptr<int>(y / 4)[(x / 4) * channels + c];
        if (noisy && rng.uniform(0, 4) == 0) v += rng.uniform(-1, 2);
        switch (m.depth()) {
          case CV_8U: m.ptr<uint8_t>(y)[x * channels + c] = uint8_t(v); break;
          case CV_32S: m.ptr<int32_t>(y)[x * channels + c] = v; break;
          default: m.ptr<float>(y)[x * channels + c] = float(v); break;
        }
      }
  return m;
}

void compare(int type, Kind kind, bool conn8, const std::function<ZelStatus(cv::Mat&, ZeliPoint, double, double,
                                                                          ZeliConnectedComp*, Zel8u*)>& fill) {
  cv::RNG rng(31 + type * 7 + int(kind) * 3 + conn8);
  for (int trial = 0; trial < 30; ++trial) {
    const int w = rng.uniform(24, 120), h = rng.uniform(24, 90);
    cv::Mat ours = blockImage(rng, type, w, h);
    cv::Mat theirs = ours.clone();
    const ZeliPoint seed = {rng.uniform(0, w), rng.uniform(0, h)};
    const double d = kind == Kind::Plain ? 0.0 : double(rng.uniform(0, 4));
    const double nv = 200.0;  // outside every interval
    SCOPED_TRACE(testing::Message() << w << "x" << h << " seed " << seed.x << "," << seed.y << " delta " << d);
    int bytes = 0;
    (kind == Kind::Grad ? zeliFloodFillGetSize_Grad : zeliFloodFillGetSize)({w, h}, &bytes);
    std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
    ZeliConnectedComp region;
    ASSERT_EQ(fill(ours, seed, nv, d, &region, buffer.data()), zelStatusOk);
    cv::Rect rect;
    const int flags = (conn8 ? 8 : 4) | (kind == Kind::Range ? cv::FLOODFILL_FIXED_RANGE : 0);
    const int area = cv::floodFill(theirs, cv::Point(seed.x, seed.y), cv::Scalar::all(nv), &rect,
                                   cv::Scalar::all(d), cv::Scalar::all(d), flags);
    cv::Mat diff;
    cv::absdiff(ours.reshape(1), theirs.reshape(1), diff);
    EXPECT_EQ(cv::countNonZero(diff), 0);
    EXPECT_EQ(region.area, double(area));
    EXPECT_EQ(region.rect.x, rect.x);
    EXPECT_EQ(region.rect.y, rect.y);
    EXPECT_EQ(region.rect.width, rect.width);
    EXPECT_EQ(region.rect.height, rect.height);
  }
}

template <typename T>
T* px(cv::Mat& m) {
  return m.ptr<T>();
}
int stepOf(const cv::Mat& m) { return int(m.step[0]); }
ZeliSize roiOf(const cv::Mat& m) { return {m.cols, m.rows}; }

// One-channel members: value arguments by value.
#define CV_FILL1(fn, T)                                                                                  \
  [](cv::Mat& m, ZeliPoint s, double nv, double, ZeliConnectedComp* r, Zel8u* b) {                      \
    return fn(px<T>(m), stepOf(m), roiOf(m), s, T(nv), r, b);                                            \
  }
#define CV_FILL3(fn, T)                                                                                  \
  [](cv::Mat& m, ZeliPoint s, double nv, double, ZeliConnectedComp* r, Zel8u* b) {                      \
    const T v[3] = {T(nv), T(nv), T(nv)};                                                                \
    return fn(px<T>(m), stepOf(m), roiOf(m), s, v, r, b);                                                \
  }
#define CV_DELTA1(fn, T)                                                                                 \
  [](cv::Mat& m, ZeliPoint s, double nv, double d, ZeliConnectedComp* r, Zel8u* b) {                    \
    return fn(px<T>(m), stepOf(m), roiOf(m), s, T(nv), T(d), T(d), r, b);                                \
  }
#define CV_DELTA3(fn, T)                                                                                 \
  [](cv::Mat& m, ZeliPoint s, double nv, double d, ZeliConnectedComp* r, Zel8u* b) {                    \
    const T v[3] = {T(nv), T(nv), T(nv)}, dd[3] = {T(d), T(d), T(d)};                                    \
    return fn(px<T>(m), stepOf(m), roiOf(m), s, v, dd, dd, r, b);                                        \
  }

TEST(FloodFillConformity, PlainFillsMatch) {
  compare(CV_8UC1, Kind::Plain, false, CV_FILL1(zeliFloodFill_4Con_8u_C1IR, Zel8u));
  compare(CV_8UC1, Kind::Plain, true, CV_FILL1(zeliFloodFill_8Con_8u_C1IR, Zel8u));
  compare(CV_8UC3, Kind::Plain, false, CV_FILL3(zeliFloodFill_4Con_8u_C3IR, Zel8u));
  compare(CV_8UC3, Kind::Plain, true, CV_FILL3(zeliFloodFill_8Con_8u_C3IR, Zel8u));
  compare(CV_32SC1, Kind::Plain, false, CV_FILL1(zeliFloodFill_4Con_32s_C1IR, Zel32s));
  compare(CV_32SC1, Kind::Plain, true, CV_FILL1(zeliFloodFill_8Con_32s_C1IR, Zel32s));
  compare(CV_32FC1, Kind::Plain, false, CV_FILL1(zeliFloodFill_4Con_32f_C1IR, Zel32f));
  compare(CV_32FC1, Kind::Plain, true, CV_FILL1(zeliFloodFill_8Con_32f_C1IR, Zel32f));
  compare(CV_32FC3, Kind::Plain, false, CV_FILL3(zeliFloodFill_4Con_32f_C3IR, Zel32f));
  compare(CV_32FC3, Kind::Plain, true, CV_FILL3(zeliFloodFill_8Con_32f_C3IR, Zel32f));
}

TEST(FloodFillConformity, FixedRangeFillsMatch) {
  compare(CV_8UC1, Kind::Range, false, CV_DELTA1(zeliFloodFill_Range4Con_8u_C1IR, Zel8u));
  compare(CV_8UC1, Kind::Range, true, CV_DELTA1(zeliFloodFill_Range8Con_8u_C1IR, Zel8u));
  compare(CV_8UC3, Kind::Range, false, CV_DELTA3(zeliFloodFill_Range4Con_8u_C3IR, Zel8u));
  compare(CV_8UC3, Kind::Range, true, CV_DELTA3(zeliFloodFill_Range8Con_8u_C3IR, Zel8u));
  compare(CV_32FC1, Kind::Range, false, CV_DELTA1(zeliFloodFill_Range4Con_32f_C1IR, Zel32f));
  compare(CV_32FC1, Kind::Range, true, CV_DELTA1(zeliFloodFill_Range8Con_32f_C1IR, Zel32f));
  compare(CV_32FC3, Kind::Range, false, CV_DELTA3(zeliFloodFill_Range4Con_32f_C3IR, Zel32f));
  compare(CV_32FC3, Kind::Range, true, CV_DELTA3(zeliFloodFill_Range8Con_32f_C3IR, Zel32f));
}

TEST(FloodFillConformity, FloatingRangeFillsMatch) {
  compare(CV_8UC1, Kind::Grad, false, CV_DELTA1(zeliFloodFill_Grad4Con_8u_C1IR, Zel8u));
  compare(CV_8UC1, Kind::Grad, true, CV_DELTA1(zeliFloodFill_Grad8Con_8u_C1IR, Zel8u));
  compare(CV_8UC3, Kind::Grad, false, CV_DELTA3(zeliFloodFill_Grad4Con_8u_C3IR, Zel8u));
  compare(CV_8UC3, Kind::Grad, true, CV_DELTA3(zeliFloodFill_Grad8Con_8u_C3IR, Zel8u));
  compare(CV_32FC1, Kind::Grad, false, CV_DELTA1(zeliFloodFill_Grad4Con_32f_C1IR, Zel32f));
  compare(CV_32FC1, Kind::Grad, true, CV_DELTA1(zeliFloodFill_Grad8Con_32f_C1IR, Zel32f));
  compare(CV_32FC3, Kind::Grad, false, CV_DELTA3(zeliFloodFill_Grad4Con_32f_C3IR, Zel32f));
  compare(CV_32FC3, Kind::Grad, true, CV_DELTA3(zeliFloodFill_Grad8Con_32f_C3IR, Zel32f));
}

}  // namespace
