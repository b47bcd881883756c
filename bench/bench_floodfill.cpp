// Flood fill against cv::floodFill on 8u one-channel pictures: plain fills
// (equal to the seed), fixed-range and floating-range (gradient) fills, 4-
// and 8-connected. The seed lies in a background that covers most of the
// picture around discs and bars, so the fill visits a large region (for the
// floating range, once noisy and once a smooth ramp). Each
// iteration restores the picture with the timer paused.
#include <opencv2/imgproc.hpp>

#include <memory>

#include "harness.h"

namespace {

using zelbench::Size;

// Background 100 (with noise of +-2 for the range fills, or a gentle ramp
// from 40 to 160 across the picture), obstacles 220.
cv::Mat scene(int width, int height, bool noisy, bool ramp = false) {
  cv::Mat m(height, width, CV_8UC1, cv::Scalar(100));
  if (ramp)
    for (int y = 0; y < height; ++y)
      for (int x = 0; x < width; ++x) m.at<uint8_t>(y, x) = uint8_t(40 + (120 * x) / width);
  if (noisy) {
    cv::Mat noise(height, width, CV_8UC1);
    cv::RNG rng(11);
    rng.fill(noise, cv::RNG::UNIFORM, 0, 5);
    m += noise;
    m -= cv::Scalar(2);
  }
  cv::RNG rng(5);
  for (int i = 0; i < 40; ++i) {
    const cv::Point c(rng.uniform(0, width), rng.uniform(0, height));
    cv::circle(m, c, rng.uniform(5, height / 12), cv::Scalar(220), cv::FILLED);
  }
  for (int i = 0; i < 12; ++i) {
    const cv::Point a(rng.uniform(0, width), rng.uniform(0, height));
    const cv::Point b(rng.uniform(0, width), rng.uniform(0, height));
    cv::line(m, a, b, cv::Scalar(220), 2);
  }
  // Keep the seed's corner free of obstacles.
  for (int y = 0; y < 4; ++y)
    for (int x = 0; x < 4; ++x) m.at<uint8_t>(y, x) = ramp ? uint8_t(40 + (120 * x) / width) : 100;
  return m;
}

enum class Kind { Plain, Range, Grad, GradSmooth };

void registerCase(const Size& s, Kind kind, bool conn8) {
  const char* kindName = kind == Kind::Plain    ? "plain"
                         : kind == Kind::Range  ? "fixed_range"
                         : kind == Kind::Grad   ? "floating_range"
                                                : "floating_range_ramp";
  const std::string name = std::string(kindName) + (conn8 ? "_8con/" : "_4con/") + s.name;
  const bool ramp = kind == Kind::GradSmooth;
  if (ramp) kind = Kind::Grad;
  auto pristine = std::make_shared<cv::Mat>(scene(s.width, s.height, kind != Kind::Plain && !ramp, ramp));
  const cv::Point seed(1, 1);
  const int lo = 3, up = 3;
  zelbench::registerPair(
      "floodfill", name,
      [=](benchmark::State& state) {
        cv::Mat img = pristine->clone();
        int bytes = 0;
        const ZeliSize roi = zelbench::roiOf(img);
        if (kind == Kind::Grad)
          zeliFloodFillGetSize_Grad(roi, &bytes);
        else
          zeliFloodFillGetSize(roi, &bytes);
        std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
        ZeliConnectedComp region;
        const ZeliPoint p = {seed.x, seed.y};
        for (auto _ : state) {
          state.PauseTiming();
          pristine->copyTo(img);
          state.ResumeTiming();
          ZelStatus st;
          const int step = zelbench::stepOf(img);
          if (kind == Kind::Plain)
            st = conn8 ? zeliFloodFill_8Con_8u_C1IR(img.data, step, roi, p, 0, &region, buffer.data())
                       : zeliFloodFill_4Con_8u_C1IR(img.data, step, roi, p, 0, &region, buffer.data());
          else if (kind == Kind::Range)
            st = conn8 ? zeliFloodFill_Range8Con_8u_C1IR(img.data, step, roi, p, 0, lo, up, &region, buffer.data())
                       : zeliFloodFill_Range4Con_8u_C1IR(img.data, step, roi, p, 0, lo, up, &region, buffer.data());
          else
            st = conn8 ? zeliFloodFill_Grad8Con_8u_C1IR(img.data, step, roi, p, 0, lo, up, &region, buffer.data())
                       : zeliFloodFill_Grad4Con_8u_C1IR(img.data, step, roi, p, 0, lo, up, &region, buffer.data());
          benchmark::DoNotOptimize(st);
          benchmark::ClobberMemory();
        }
        state.counters["area"] = region.area;
      },
      [=](benchmark::State& state) {
        cv::Mat img = pristine->clone();
        cv::Rect rect;
        int area = 0;
        const int flags = (conn8 ? 8 : 4) | (kind == Kind::Range ? cv::FLOODFILL_FIXED_RANGE : 0);
        const cv::Scalar dlo = kind == Kind::Plain ? cv::Scalar() : cv::Scalar(lo);
        const cv::Scalar dup = kind == Kind::Plain ? cv::Scalar() : cv::Scalar(up);
        for (auto _ : state) {
          state.PauseTiming();
          pristine->copyTo(img);
          state.ResumeTiming();
          area = cv::floodFill(img, seed, cv::Scalar(0), &rect, dlo, dup, flags);
          benchmark::ClobberMemory();
        }
        state.counters["area"] = area;
      });
}

void registerFloodFill() {
  for (const Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;
    for (Kind kind : {Kind::Plain, Kind::Range, Kind::Grad, Kind::GradSmooth})
      for (bool conn8 : {false, true}) registerCase(s, kind, conn8);
  }
}

zelbench::Registrar registrar(&registerFloodFill);

}  // namespace
