// Gaussian pyramid levels against cv::pyrDown and cv::pyrUp (both use the
// 5-tap binomial kernel with reflection at the edges), and a rate-2 five-tap
// layer state against cv::pyrDown.
#include <memory>
#include <vector>

#include <opencv2/imgproc.hpp>

#include "harness.h"

namespace {

using zelbench::Size;


struct Case {
  const char* name;
  int cvType;
  ZelDataType code;
  int channels;
  ZelStatus (*down)(const Zel8u*, int, Zel8u*, int, ZeliSize, Zel8u*);
  ZelStatus (*up)(const Zel8u*, int, Zel8u*, int, ZeliSize, Zel8u*);
};

// The float members take Zel32f pointers; the benchmark passes bytes.
template <typename T, ZelStatus (*F)(const T*, int, T*, int, ZeliSize, Zel8u*)>
ZelStatus asBytes(const Zel8u* s, int ss, Zel8u* d, int ds, ZeliSize r, Zel8u* b) {
  return F(reinterpret_cast<const T*>(s), ss, reinterpret_cast<T*>(d), ds, r, b);
}

const Case kCases[] = {
    {"8u_C1", CV_8UC1, zel8u, 1, zeliPyrDown_Gauss5x5_8u_C1R, zeliPyrUp_Gauss5x5_8u_C1R},
    {"8u_C3", CV_8UC3, zel8u, 3, zeliPyrDown_Gauss5x5_8u_C3R, zeliPyrUp_Gauss5x5_8u_C3R},
    {"32f_C1", CV_32FC1, zel32f, 1, asBytes<Zel32f, zeliPyrDown_Gauss5x5_32f_C1R>,
     asBytes<Zel32f, zeliPyrUp_Gauss5x5_32f_C1R>},
};

void registerPyramid() {
  for (const Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;
    const std::string size = s.name;
    for (const Case& c : kCases) {
      auto image = std::make_shared<cv::Mat>(zelbench::randomMat(s.width, s.height, c.cvType));
      const Case cs = c;
      zelbench::registerPair(
          "pyramid", std::string("down_") + c.name + "/" + size,
          [=](benchmark::State& state) {
            int bytes = 0;
            zeliPyrDownGetBufSize_Gauss5x5(s.width, cs.code, cs.channels, &bytes);
            std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
            cv::Mat dst((s.height + 1) / 2, (s.width + 1) / 2, cs.cvType);
            for (auto _ : state) {
              ZelStatus st = cs.down(image->data, zelbench::stepOf(*image), dst.data, zelbench::stepOf(dst),
                                     zelbench::roiOf(*image), buffer.data());
              benchmark::DoNotOptimize(st);
              benchmark::ClobberMemory();
            }
          },
          [=](benchmark::State& state) {
            cv::Mat dst((s.height + 1) / 2, (s.width + 1) / 2, cs.cvType);
            for (auto _ : state) {
              cv::pyrDown(*image, dst, dst.size());
              benchmark::ClobberMemory();
            }
          });
      // Up from the half-size image to the full size.
      auto half = std::make_shared<cv::Mat>(zelbench::randomMat(s.width / 2, s.height / 2, c.cvType));
      zelbench::registerPair(
          "pyramid", std::string("up_") + c.name + "/" + size,
          [=](benchmark::State& state) {
            int bytes = 0;
            zeliPyrUpGetBufSize_Gauss5x5(half->cols, cs.code, cs.channels, &bytes);
            std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
            cv::Mat dst(half->rows * 2, half->cols * 2, cs.cvType);
            for (auto _ : state) {
              ZelStatus st = cs.up(half->data, zelbench::stepOf(*half), dst.data, zelbench::stepOf(dst),
                                   zelbench::roiOf(*half), buffer.data());
              benchmark::DoNotOptimize(st);
              benchmark::ClobberMemory();
            }
          },
          [=](benchmark::State& state) {
            cv::Mat dst(half->rows * 2, half->cols * 2, cs.cvType);
            for (auto _ : state) {
              cv::pyrUp(*half, dst, dst.size());
              benchmark::ClobberMemory();
            }
          });
    }

    // A rate-2 layer with the binomial taps: the same job as pyrDown.
    auto image = std::make_shared<cv::Mat>(zelbench::naturalImage(s.width, s.height));
    zelbench::registerPair(
        "pyramid", "layer_down_8u_C1_rate2_k5/" + size,
        [=](benchmark::State& state) {
          const Zel16s taps[5] = {1, 4, 6, 4, 1};
          ZeliPyramidLayerState* layer = nullptr;
          zeliPyramidLayerDownInitAlloc_8u_C1R(&layer, zelbench::roiOf(*image), 2.0f, taps, 5, 2);
          ZeliSize d;
          zeliGetPyramidDownROI(zelbench::roiOf(*image), &d, 2.0f);
          cv::Mat dst(d.height, d.width, CV_8UC1);
          for (auto _ : state) {
            ZelStatus st = zeliPyramidLayerDown_8u_C1R(image->data, zelbench::stepOf(*image), zelbench::roiOf(*image),
                                                       dst.data, zelbench::stepOf(dst), d, layer);
            benchmark::DoNotOptimize(st);
            benchmark::ClobberMemory();
          }
          zeliPyramidLayerDownFree_8u_C1R(layer);
        },
        [=](benchmark::State& state) {
          cv::Mat dst((s.height + 1) / 2, (s.width + 1) / 2, CV_8UC1);
          for (auto _ : state) {
            cv::pyrDown(*image, dst, dst.size());
            benchmark::ClobberMemory();
          }
        });
  }
}

zelbench::Registrar registrar(&registerPyramid);

}  // namespace
