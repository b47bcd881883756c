// Canny edges from an 8-bit picture: zeliCannyBorder_8u_C1R against cv::Canny
// with the same kernel, norm and thresholds, both replicating the border.
#include <opencv2/imgproc.hpp>

#include <string>
#include <vector>

#include "harness.h"

namespace {

constexpr float kLow = 40.0f, kHigh = 120.0f;

void registerCanny() {
  struct Case {
    const char* name;
    int mask, norm;
  };
  const Case cases[] = {{"sobel3x3_L1", zelMaskSize3x3, zelNormL1},
                        {"sobel3x3_L2", zelMaskSize3x3, zelNormL2},
                        {"sobel5x5_L1", zelMaskSize5x5, zelNormL1}};
  for (const zelbench::Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;  // the detector is measured at the two picture sizes
    for (const Case& c : cases) {
      const std::string name = std::string(c.name) + "/" + s.name;
      zelbench::registerPair(
          "canny", name,
          [s, c](benchmark::State& state) {
            cv::Mat src = zelbench::naturalImage(s.width, s.height);
            cv::Mat dst(s.height, s.width, CV_8UC1);
            int bytes = 0;
            zeliCannyBorderGetSize(zelbench::roiOf(src), zelFilterSobel, c.mask, c.norm, &bytes);
            std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
            for (auto _ : state) {
              ZelStatus status = zeliCannyBorder_8u_C1R(
                  src.data, zelbench::stepOf(src), dst.data, zelbench::stepOf(dst), zelbench::roiOf(src),
                  zelFilterSobel, c.mask, zelBorderReplicate, 0, kLow, kHigh, c.norm, buffer.data());
              if (status != zelStatusOk) state.SkipWithError("zeliCannyBorder_8u_C1R failed");
              benchmark::ClobberMemory();
            }
          },
          [s, c](benchmark::State& state) {
            cv::Mat src = zelbench::naturalImage(s.width, s.height);
            cv::Mat dst(s.height, s.width, CV_8UC1);
            const int aperture = c.mask == zelMaskSize5x5 ? 5 : 3;
            for (auto _ : state) {
              cv::Canny(src, dst, kLow, kHigh, aperture, c.norm == zelNormL2);
              benchmark::ClobberMemory();
            }
          });
    }
  }
}

zelbench::Registrar registrar(&registerCanny);

}  // namespace
