// One scale of the stock frontal-face cascade over a 640 x 480 photograph,
// every second window in x and y, against cv::CascadeClassifier restricted
// to the same scale (minimum and maximum size one window) with no grouping.
// Our side counts everything the detection needs: the integral and squared
// integral, the window deviations, the grid mask and the 25 stages.
#include <opencv2/imgcodecs.hpp>
#include <opencv2/imgproc.hpp>
#include <opencv2/objdetect.hpp>

#include "harness.h"
#include "support/haar_detector.h"

namespace {

void registerHaar() {
  auto cascade = std::make_shared<zeltest::HaarCascade>();
  std::string error;
  if (!zeltest::loadHaarCascade(ZELCV_FACE_CASCADE, *cascade, error)) return;
  cv::Mat picture = cv::imread(ZELCV_TEST_DATA_DIR "/astronaut.png", cv::IMREAD_GRAYSCALE);
  if (picture.empty()) return;
  auto gray = std::make_shared<cv::Mat>();
  cv::resize(picture, *gray, cv::Size(640, 480), 0, 0, cv::INTER_LINEAR);

  zelbench::registerPair(
      "haar", "face_one_scale/640x480",
      [=](benchmark::State& state) {
        zeltest::HaarDetector detector(*cascade);
        std::vector<uint8_t> mask;
        for (auto _ : state) {
          bool ok = detector.run(gray->data, int(gray->step), gray->cols, gray->rows, 2, 10.0f, mask);
          benchmark::DoNotOptimize(ok);
          benchmark::ClobberMemory();
        }
      },
      [=](benchmark::State& state) {
        cv::CascadeClassifier classifier(ZELCV_FACE_CASCADE);
        std::vector<cv::Rect> found;
        const cv::Size window(cascade->width, cascade->height);
        for (auto _ : state) {
          classifier.detectMultiScale(*gray, found, 1.1, 0, 0, window, window);
          benchmark::ClobberMemory();
        }
      });
}

zelbench::Registrar registrar(registerHaar);

}  // namespace
