// The mixture model per frame against cv::BackgroundSubtractorMOG2::apply
// (shadows off, the same number of components, one thread), on a noisy
// frame sequence so that both models keep working every frame. Both sides
// learn one frame before timing starts, so that OpenCV's allocation of its
// model on the first call is not timed.
#include <opencv2/imgproc.hpp>
#include <opencv2/video/background_segm.hpp>

#include "harness.h"

namespace {

constexpr int kFrames = 8;

std::vector<cv::Mat> sequence(int w, int h) {
  std::vector<cv::Mat> frames;
  const cv::Mat base = zelbench::naturalImage(w, h, 3);
  cv::Mat base3;
  cv::merge(std::vector<cv::Mat>{base, base, base}, base3);
  cv::RNG rng(5);
  for (int i = 0; i < kFrames; ++i) {
    cv::Mat noise(h, w, CV_8UC3), f;
    rng.fill(noise, cv::RNG::NORMAL, 0, 4);
    cv::add(base3, noise, f);
    cv::rectangle(f, cv::Rect(w / 8 + i * w / 16, h / 3, w / 6, h / 4), cv::Scalar(30, 200, 60), -1);
    frames.push_back(f);
  }
  return frames;
}

void registerBackground() {
  for (const zelbench::Size& s : zelbench::kSizes) {
    if (s.width > 2000) continue;
    for (int k : {3, 5}) {
      const std::string name = std::string("fgmm_k") + std::to_string(k) + "/" + s.name;
      const int w = s.width, h = s.height;
      zelbench::registerPair(
          "background", name,
          [w, h, k](benchmark::State& st) {
            const std::vector<cv::Mat> frames = sequence(w, h);
            int bytes = 0;
            zeliFGMMGetBufferSize_8u_C3R(ZeliSize{w, h}, k, &bytes);
            std::vector<uint8_t> block(static_cast<size_t>(bytes));
            auto* model = reinterpret_cast<ZeliFGMMState*>(block.data());
            zeliFGMMInit_8u_C3R(ZeliSize{w, h}, k, nullptr, model);
            cv::Mat mask(h, w, CV_8UC1);
            // One frame before timing, as on the OpenCV side, whose first
            // call also allocates and seeds its model.
            zeliFGMMForeground_8u_C3R(frames[0].data, zelbench::stepOf(frames[0]), mask.data,
                                      zelbench::stepOf(mask), ZeliSize{w, h}, model);
            size_t i = 1;
            for (auto _ : st) {
              const cv::Mat& f = frames[i++ % frames.size()];
              zeliFGMMForeground_8u_C3R(f.data, zelbench::stepOf(f), mask.data, zelbench::stepOf(mask),
                                        ZeliSize{w, h}, model);
            }
          },
          [w, h, k](benchmark::State& st) {
            const std::vector<cv::Mat> frames = sequence(w, h);
            cv::Ptr<cv::BackgroundSubtractorMOG2> mog = cv::createBackgroundSubtractorMOG2(500, 16, false);
            mog->setNMixtures(k);
            cv::Mat mask;
            mog->apply(frames[0], mask);
            size_t i = 1;
            for (auto _ : st) mog->apply(frames[i++ % frames.size()], mask);
          });
    }
  }
}

const zelbench::Registrar registrar(registerBackground);

}  // namespace
