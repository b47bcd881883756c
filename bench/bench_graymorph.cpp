// Grey-level morphology and reconstruction.
//
// Reconstruction by dilation of 8u images against the loop an OpenCV user
// writes (3x3 dilation, minimum with the mask, until no pixel changes), with
// a marker that must travel across the whole image: one bright pixel in a
// corner under a natural picture as the mask. Both sides start from a fresh
// copy of the marker on every call.
//
// Grey dilation has no OpenCV counterpart: its rows ("gray-vs-our-flat")
// compare it with our own flat dilation of the same window, which stands in
// the reference column there.
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include <opencv2/imgproc.hpp>

#include "harness.h"

namespace {

void registerReconstruct(int width, int height, const char* sizeName) {
  const cv::Mat mask = zelbench::naturalImage(width, height);
  cv::Mat marker = cv::Mat::zeros(height, width, CV_8UC1);
  marker.at<uint8_t>(0, 0) = 255;
  int size = 0;
  zeliMorphReconstructGetBufferSize_8u_C1({width, height}, &size);
  auto buffer = std::make_shared<std::vector<Zel8u>>(size_t(size));
  zelbench::registerPair(
      "graymorph", std::string("reconstruct_dilate_8u/corner-seed/") + sizeName,
      [=](benchmark::State& state) {
        cv::Mat work(marker.size(), CV_8UC1);
        for (auto _ : state) {
          marker.copyTo(work);
          zeliMorphReconstructDilate_8u_C1IR(work.data, zelbench::stepOf(work), mask.data, zelbench::stepOf(mask),
                                             zelbench::roiOf(work), zelNormInf, buffer->data());
          benchmark::ClobberMemory();
        }
      },
      [=](benchmark::State& state) {
        const cv::Mat kernel = cv::getStructuringElement(cv::MORPH_RECT, cv::Size(3, 3));
        cv::Mat current, next, changed;
        int steps = 0;
        for (auto _ : state) {
          marker.copyTo(current);
          cv::min(current, mask, current);
          for (;;) {
            cv::dilate(current, next, kernel);
            cv::min(next, mask, next);
            cv::compare(next, current, changed, cv::CMP_NE);
            ++steps;
            if (cv::countNonZero(changed) == 0) break;
            cv::swap(current, next);
          }
          benchmark::ClobberMemory();
        }
        state.counters["steps"] = double(steps) / double(state.iterations());
      });
}

// A paraboloid of height 0 at the centre falling by 4 per unit of squared
// distance (a non-flat function), and the flat window of the same size.
void registerGrayDilate(int window) {
  const int width = 1920, height = 1080;
  const cv::Mat src = zelbench::randomMat(width, height, CV_8UC1);
  std::vector<Zel32s> f(size_t(window * window));
  std::vector<Zel8u> flatMask(f.size(), 1);
  const int c = window / 2;
  for (int j = 0; j < window; ++j)
    for (int i = 0; i < window; ++i) f[size_t(j * window + i)] = -4 * ((i - c) * (i - c) + (j - c) * (j - c));
  int graySize = 0, stateSize = 0, bufferSize = 0;
  zeliMorphGrayGetSize_8u_C1R(width, {window, window}, &graySize);
  auto gray = std::make_shared<std::vector<uint8_t>>(size_t(graySize));
  zeliMorphGrayInit_8u_C1R(width, f.data(), {window, window}, {c, c},
                           reinterpret_cast<ZeliMorphGrayState*>(gray->data()));
  zeliMorphologyBorderGetSize_8u_C1R(width, {window, window}, &stateSize, &bufferSize);
  auto flatState = std::make_shared<std::vector<uint8_t>>(size_t(stateSize));
  auto flatBuffer = std::make_shared<std::vector<uint8_t>>(size_t(bufferSize));
  zeliMorphologyBorderInit_8u_C1R(width, flatMask.data(), {window, window},
                                  reinterpret_cast<ZeliMorphState*>(flatState->data()), nullptr);
  const std::string name = "gray-vs-our-flat/" + std::to_string(window) + "x" + std::to_string(window) + "/1920x1080";
  const int64_t bytes = 2 * int64_t(src.total());
  zelbench::registerPair(
      "graymorph", name,
      [=](benchmark::State& state) {
        cv::Mat dst(src.size(), src.type());
        for (auto _ : state) {
          zeliGrayDilateBorder_8u_C1R(src.data, zelbench::stepOf(src), dst.data, zelbench::stepOf(dst),
                                      zelbench::roiOf(src), zelBorderReplicate,
                                      reinterpret_cast<ZeliMorphGrayState*>(gray->data()));
          benchmark::ClobberMemory();
        }
        state.SetBytesProcessed(int64_t(state.iterations()) * bytes);
      },
      [=](benchmark::State& state) {
        cv::Mat dst(src.size(), src.type());
        for (auto _ : state) {
          zeliDilateBorder_8u_C1R(src.data, zelbench::stepOf(src), dst.data, zelbench::stepOf(dst),
                                  zelbench::roiOf(src), zelBorderReplicate, 0,
                                  reinterpret_cast<const ZeliMorphState*>(flatState->data()), flatBuffer->data());
          benchmark::ClobberMemory();
        }
        state.SetBytesProcessed(int64_t(state.iterations()) * bytes);
      });
}

void registerGraymorph() {
  registerReconstruct(640, 480, "640x480");
  registerReconstruct(1920, 1080, "1920x1080");
  for (int window : {3, 5}) registerGrayDilate(window);
}

zelbench::Registrar registrar(&registerGraymorph);

}  // namespace
