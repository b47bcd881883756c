// Compound morphology against OpenCV: opening, closing, top-hat, black-hat
// and gradient of an 8u image at 1920x1080 with 3x3 and 11x11 rectangles,
// replicated border, through the caller-memory state.
#include <memory>
#include <string>
#include <vector>

#include <opencv2/imgproc.hpp>

#include "harness.h"

namespace {

using AdvOp = ZelStatus (*)(const Zel8u*, int, Zel8u*, int, ZeliSize, ZeliBorderType, Zel8u,
                            const ZeliMorphAdvState*, Zel8u*);

struct Prepared {
  std::vector<Zel8u> mask, state, buffer;
  const ZeliMorphAdvState* st() const { return reinterpret_cast<const ZeliMorphAdvState*>(state.data()); }
};

void registerMorphAdv() {
  const int width = 1920, height = 1080;
  const struct {
    const char* name;
    AdvOp op;
    int cvOp;
  } ops[] = {{"open", zeliMorphOpenBorder_8u_C1R, cv::MORPH_OPEN},
             {"close", zeliMorphCloseBorder_8u_C1R, cv::MORPH_CLOSE},
             {"tophat", zeliMorphTophatBorder_8u_C1R, cv::MORPH_TOPHAT},
             {"blackhat", zeliMorphBlackhatBorder_8u_C1R, cv::MORPH_BLACKHAT},
             {"gradient", zeliMorphGradientBorder_8u_C1R, cv::MORPH_GRADIENT}};
  const cv::Mat src = zelbench::randomMat(width, height, CV_8UC1);
  const int64_t bytes = 2 * int64_t(src.total());
  for (int size : {3, 11}) {
    const cv::Mat kernel = cv::getStructuringElement(cv::MORPH_RECT, cv::Size(size, size));
    auto p = std::make_shared<Prepared>();
    p->mask.assign(kernel.datastart, kernel.dataend);
    const ZeliSize maskSize = {size, size}, roi = {width, height};
    int stateSize = 0, bufferSize = 0;
    zeliMorphAdvGetSize_8u_C1R(roi, maskSize, &stateSize, &bufferSize);
    p->state.resize(size_t(stateSize));
    p->buffer.resize(size_t(bufferSize));
    zeliMorphAdvInit_8u_C1R(roi, p->mask.data(), maskSize, reinterpret_cast<ZeliMorphAdvState*>(p->state.data()),
                            p->buffer.data());
    const std::string rect = "rect" + std::to_string(size) + "x" + std::to_string(size);
    for (const auto& o : ops) {
      const AdvOp op = o.op;
      const int cvOp = o.cvOp;
      zelbench::registerPair(
          "morphadv", std::string(o.name) + "_8u_C1/" + rect + "/1920x1080",
          [=](benchmark::State& state) {
            cv::Mat dst(src.size(), src.type());
            for (auto _ : state) {
              op(src.data, zelbench::stepOf(src), dst.data, zelbench::stepOf(dst), roi, zelBorderReplicate, 0,
                 p->st(), p->buffer.data());
              benchmark::ClobberMemory();
            }
            state.SetBytesProcessed(int64_t(state.iterations()) * bytes);
          },
          [=](benchmark::State& state) {
            cv::Mat dst(src.size(), src.type());
            for (auto _ : state) {
              cv::morphologyEx(src, dst, cvOp, kernel, cv::Point(-1, -1), 1, cv::BORDER_REPLICATE);
              benchmark::ClobberMemory();
            }
            state.SetBytesProcessed(int64_t(state.iterations()) * bytes);
          });
    }
  }
}

zelbench::Registrar registrar(&registerMorphAdv);

}  // namespace
