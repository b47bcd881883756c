// Segmentation against OpenCV at 640x480 and 1920x1080: labelling of a
// binary picture (cv::connectedComponents, 8- and 4-connected), speckle
// marking of a noisy disparity-like 16s picture (cv::filterSpeckles),
// watershed from a few dozen seeds (cv::watershed; ours floods the
// gradient relief, OpenCV the colour picture), and inpainting of scratches by
// fast marching (cv::inpaint; ours builds and frees its state inside the
// timing). Inputs are restored with the timer paused.
#include <opencv2/calib3d.hpp>
#include <opencv2/imgproc.hpp>
#include <opencv2/photo.hpp>

#include <memory>

#include "harness.h"

namespace {

using zelbench::Size;

cv::Mat binaryPicture(const Size& s) {
  cv::Mat grey = zelbench::naturalImage(s.width, s.height), bin;
  cv::threshold(grey, bin, 128, 255, cv::THRESH_BINARY);
  return bin;
}

void registerLabels(const Size& s, bool conn8) {
  auto src = std::make_shared<cv::Mat>(binaryPicture(s));
  const std::string name = std::string(conn8 ? "label_8con/" : "label_4con/") + s.name;
  zelbench::registerPair(
      "segmentation", name,
      [=](benchmark::State& state) {
        cv::Mat labels(src->rows, src->cols, CV_32SC1);
        int bytes = 0, num = 0;
        zeliLabelMarkersGetBufferSize_8u32s_C1R(zelbench::roiOf(*src), &bytes);
        std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
        for (auto _ : state) {
          zeliLabelMarkers_8u32s_C1R(src->data, zelbench::stepOf(*src), labels.ptr<Zel32s>(),
                                     zelbench::stepOf(labels), zelbench::roiOf(*src), 1, 1 << 30,
                                     conn8 ? zelNormInf : zelNormL1, &num, buffer.data());
          benchmark::ClobberMemory();
        }
        state.counters["regions"] = num;
      },
      [=](benchmark::State& state) {
        cv::Mat labels;
        int n = 0;
        for (auto _ : state) {
          n = cv::connectedComponents(*src, labels, conn8 ? 8 : 4, CV_32S);
          benchmark::ClobberMemory();
        }
        state.counters["regions"] = n - 1;
      });
}

void registerSpeckles(const Size& s) {
  cv::Mat grey = zelbench::naturalImage(s.width, s.height, 3);
  auto pristine = std::make_shared<cv::Mat>();
  grey.convertTo(*pristine, CV_16SC1, 16.0);
  const int maxSize = 200, diff = 16;
  zelbench::registerPair(
      "segmentation", std::string("speckles_16s/") + s.name,
      [=](benchmark::State& state) {
        cv::Mat img = pristine->clone();
        int bytes = 0;
        zeliMarkSpecklesGetBufferSize(zelbench::roiOf(img), zel16s, &bytes);
        std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
        for (auto _ : state) {
          state.PauseTiming();
          pristine->copyTo(img);
          state.ResumeTiming();
          zeliMarkSpeckles_16s_C1IR(img.ptr<Zel16s>(), zelbench::stepOf(img), zelbench::roiOf(img), 0, maxSize,
                                    diff, zelNormInf, buffer.data());
          benchmark::ClobberMemory();
        }
      },
      [=](benchmark::State& state) {
        cv::Mat img = pristine->clone();
        cv::Mat scratch;
        for (auto _ : state) {
          state.PauseTiming();
          pristine->copyTo(img);
          state.ResumeTiming();
          cv::filterSpeckles(img, 0, maxSize, diff, scratch);
          benchmark::ClobberMemory();
        }
      });
}

void registerWatershed(const Size& s) {
  auto colour = std::make_shared<cv::Mat>();
  cv::Mat grey = zelbench::naturalImage(s.width, s.height);
  cv::cvtColor(grey, *colour, cv::COLOR_GRAY2BGR);
  auto relief = std::make_shared<cv::Mat>();
  cv::morphologyEx(grey, *relief, cv::MORPH_GRADIENT, cv::Mat());
  auto seeds8 = std::make_shared<cv::Mat>(s.height, s.width, CV_8UC1, cv::Scalar(0));
  auto seeds32 = std::make_shared<cv::Mat>(s.height, s.width, CV_32SC1, cv::Scalar(0));
  cv::RNG rng(9);
  for (int i = 1; i <= 60; ++i) {
    const cv::Point p(rng.uniform(0, s.width), rng.uniform(0, s.height));
    cv::circle(*seeds8, p, 3, cv::Scalar(i), cv::FILLED);
    cv::circle(*seeds32, p, 3, cv::Scalar(i), cv::FILLED);
  }
  zelbench::registerPair(
      "segmentation", std::string("watershed/") + s.name,
      [=](benchmark::State& state) {
        cv::Mat markers = seeds8->clone();
        int bytes = 0;
        zeliSegmentWatershedGetBufferSize_8u_C1R(zelbench::roiOf(markers), &bytes);
        std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
        for (auto _ : state) {
          state.PauseTiming();
          seeds8->copyTo(markers);
          state.ResumeTiming();
          zeliSegmentWatershed_8u_C1IR(relief->data, zelbench::stepOf(*relief), markers.data,
                                       zelbench::stepOf(markers), zelbench::roiOf(markers), zelNormL1,
                                       zelSegmentLines, buffer.data());
          benchmark::ClobberMemory();
        }
      },
      [=](benchmark::State& state) {
        cv::Mat markers = seeds32->clone();
        for (auto _ : state) {
          state.PauseTiming();
          seeds32->copyTo(markers);
          state.ResumeTiming();
          cv::watershed(*colour, markers);
          benchmark::ClobberMemory();
        }
      });
}

void registerInpaint(const Size& s) {
  auto img = std::make_shared<cv::Mat>(zelbench::naturalImage(s.width, s.height));
  auto mask = std::make_shared<cv::Mat>(s.height, s.width, CV_8UC1, cv::Scalar(0));
  cv::RNG rng(4);
  for (int i = 0; i < 6; ++i)
    cv::line(*mask, {rng.uniform(0, s.width), rng.uniform(0, s.height)},
             {rng.uniform(0, s.width), rng.uniform(0, s.height)}, cv::Scalar(255), 3);
  const float radius = 5.0f;
  zelbench::registerPair(
      "segmentation", std::string("inpaint/") + s.name,
      [=](benchmark::State& state) {
        cv::Mat out(img->rows, img->cols, CV_8UC1);
        for (auto _ : state) {
          ZeliInpaintState* st = nullptr;
          zeliInpaintInitAlloc_8u_C1R(mask->data, zelbench::stepOf(*mask), zelbench::roiOf(*img), radius, &st);
          zeliInpaint_8u_C1R(img->data, zelbench::stepOf(*img), out.data, zelbench::stepOf(out),
                             zelbench::roiOf(*img), st);
          zeliInpaintFree_8u_C1R(st);
          benchmark::ClobberMemory();
        }
      },
      [=](benchmark::State& state) {
        cv::Mat out;
        for (auto _ : state) {
          cv::inpaint(*img, *mask, out, radius, cv::INPAINT_TELEA);
          benchmark::ClobberMemory();
        }
      });
}

void registerSegmentation() {
  for (const Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;
    registerLabels(s, true);
    registerLabels(s, false);
    registerSpeckles(s);
    registerWatershed(s);
    registerInpaint(s);
  }
}

zelbench::Registrar registrar(&registerSegmentation);

}  // namespace
