// Pyramidal Lucas-Kanade tracking against cv::calcOpticalFlowPyrLK: 500
// corners of a natural picture followed into a shifted and slightly rotated
// copy, a 21x21 window, levels 0 .. 3, at most 30 iterations, threshold 0.01.
// Both trackers get the same pyramids (our Gaussian reductions, which equal
// cv::pyrDown for 8-bit images), padded as OpenCV requires; each call
// computes its own level derivatives, as both libraries do per call.
#include <memory>
#include <vector>

#include <opencv2/imgproc.hpp>
#include <opencv2/video/tracking.hpp>

#include "harness.h"

namespace {

constexpr int kWin = 21, kTop = 3, kPoints = 500;

struct Inputs {
  ZeliPyramid* first = nullptr;
  ZeliPyramid* second = nullptr;
  std::vector<cv::Mat> cvFirst, cvSecond;
  std::vector<cv::Point2f> corners;
  ~Inputs() {
    zeliPyramidFree(first);
    zeliPyramidFree(second);
  }
};

void build(const cv::Mat& image, ZeliPyramid** rec, std::vector<cv::Mat>* levels) {
  zeliPyramidInitAlloc(rec, kTop, {image.cols, image.rows}, 2.0f);
  cv::Mat current = image;
  for (int l = 0; l <= (*rec)->level; ++l) {
    if (l > 0) {
      const ZeliSize s = (*rec)->roiSizes[l];
      cv::Mat next(s.height, s.width, CV_8UC1);
      int bytes = 0;
      zeliPyrDownGetBufSize_Gauss5x5(current.cols, zel8u, 1, &bytes);
      std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
      zeliPyrDown_Gauss5x5_8u_C1R(current.ptr<Zel8u>(), int(current.step), next.ptr<Zel8u>(), int(next.step),
                                  {current.cols, current.rows}, buffer.data());
      current = next;
    }
    cv::Mat padded;
    const int pad = kWin + 1;
    cv::copyMakeBorder(current, padded, pad, pad, pad, pad, cv::BORDER_REFLECT_101);
    cv::Mat view = padded(cv::Rect(pad, pad, current.cols, current.rows));
    levels->push_back(view);
    (*rec)->images[l] = view.ptr<Zel8u>();
    (*rec)->steps[l] = int(view.step);
  }
}

std::shared_ptr<Inputs> makeInputs(int w, int h) {
  auto in = std::make_shared<Inputs>();
  const cv::Mat first = zelbench::naturalImage(w, h);
  cv::Mat m = cv::getRotationMatrix2D(cv::Point2f(w / 2.0f, h / 2.0f), 0.5, 1.0);
  m.at<double>(0, 2) += 2.6;
  m.at<double>(1, 2) -= 1.8;
  cv::Mat second;
  cv::warpAffine(first, second, m, first.size(), cv::INTER_LINEAR, cv::BORDER_REFLECT_101);
  cv::goodFeaturesToTrack(first, in->corners, kPoints, 0.001, 5);
  build(first, &in->first, &in->cvFirst);
  build(second, &in->second, &in->cvSecond);
  return in;
}

void registerOptflow() {
  for (const zelbench::Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;
    auto in = makeInputs(s.width, s.height);
    const ZeliSize base{s.width, s.height};
    zelbench::registerPair(
        "optflow", std::string("pyrlk_8u_21x21_L3_500pts/") + s.name,
        [=](benchmark::State& state) {
          const int n = int(in->corners.size());
          std::vector<ZeliPoint_32f> prev(static_cast<size_t>(n)), next(static_cast<size_t>(n));
          for (int i = 0; i < n; ++i) prev[size_t(i)] = {in->corners[size_t(i)].x, in->corners[size_t(i)].y};
          std::vector<Zel8s> status(static_cast<size_t>(n));
          std::vector<Zel32f> error(static_cast<size_t>(n));
          ZeliOptFlowPyrLKState* lk = nullptr;
          zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&lk, base, kWin, 0);
          for (auto _ : state) {
            next = prev;
            ZelStatus st = zeliOpticalFlowPyrLK_8u_C1R(in->first, in->second, prev.data(), next.data(),
                                                       status.data(), error.data(), n, kWin, kTop, 30, 0.01f, lk);
            benchmark::DoNotOptimize(st);
            benchmark::ClobberMemory();
          }
          zeliOpticalFlowPyrLKFree_8u_C1R(lk);
        },
        [=](benchmark::State& state) {
          std::vector<cv::Point2f> next;
          std::vector<uchar> status;
          std::vector<float> error;
          for (auto _ : state) {
            cv::calcOpticalFlowPyrLK(in->cvFirst, in->cvSecond, in->corners, next, status, error,
                                     cv::Size(kWin, kWin), kTop,
                                     cv::TermCriteria(cv::TermCriteria::COUNT | cv::TermCriteria::EPS, 30, 0.01));
            benchmark::ClobberMemory();
          }
        });
  }
}

zelbench::Registrar registrar(&registerOptflow);

}  // namespace
