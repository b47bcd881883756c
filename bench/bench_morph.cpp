// Flat morphology against OpenCV: dilation with the replicated border at
// 1920x1080, rectangles, a disc and a cross, through the newer interface.
#include <memory>
#include <string>
#include <vector>

#include <opencv2/imgproc.hpp>

#include "harness.h"

namespace {

struct MorphCase {
  const char* name;
  int shape;  // cv::MORPH_RECT, cv::MORPH_ELLIPSE, cv::MORPH_CROSS
  int size;
};

// The state and buffer for one element, built once outside the timed loop.
struct Prepared {
  std::vector<Zel8u> mask, state, buffer;
  ZeliMorphState* st() { return reinterpret_cast<ZeliMorphState*>(state.data()); }
};

template <typename GetSize, typename Init>
std::shared_ptr<Prepared> prepare(const cv::Mat& kernel, int width, GetSize getSize, Init init) {
  auto p = std::make_shared<Prepared>();
  p->mask.assign(kernel.datastart, kernel.dataend);
  const ZeliSize maskSize = {kernel.cols, kernel.rows};
  int stateSize = 0, bufferSize = 0;
  getSize(width, maskSize, &stateSize, &bufferSize);
  p->state.resize(size_t(stateSize));
  p->buffer.resize(size_t(bufferSize));
  init(width, p->mask.data(), maskSize, p->st(), p->buffer.data());
  return p;
}

template <typename T, typename GetSize, typename Init, typename Dilate>
void registerCase(const std::string& label, const MorphCase& c, int cvType, GetSize getSize, Init init,
                  Dilate dilate) {
  const int width = 1920, height = 1080;
  const cv::Mat kernel = cv::getStructuringElement(c.shape, cv::Size(c.size, c.size));
  const cv::Mat src = zelbench::randomMat(width, height, cvType);
  auto prepared = prepare(kernel, width, getSize, init);
  const int64_t bytes = 2 * int64_t(src.total()) * src.elemSize();
  zelbench::registerPair(
      "morph", label + "/" + c.name + "/1920x1080",
      [=](benchmark::State& state) {
        cv::Mat dst(src.size(), src.type());
        for (auto _ : state) {
          dilate(reinterpret_cast<const T*>(src.data), zelbench::stepOf(src), reinterpret_cast<T*>(dst.data),
                 zelbench::stepOf(dst), zelbench::roiOf(src), zelBorderReplicate, prepared->st(),
                 prepared->buffer.data());
          benchmark::ClobberMemory();
        }
        state.SetBytesProcessed(int64_t(state.iterations()) * bytes);
      },
      [=](benchmark::State& state) {
        cv::Mat dst(src.size(), src.type());
        for (auto _ : state) {
          cv::dilate(src, dst, kernel, cv::Point(-1, -1), 1, cv::BORDER_REPLICATE);
          benchmark::ClobberMemory();
        }
        state.SetBytesProcessed(int64_t(state.iterations()) * bytes);
      });
}

void registerMorph() {
  const MorphCase cases[] = {{"rect3x3", cv::MORPH_RECT, 3},  {"rect7x7", cv::MORPH_RECT, 7},
                             {"rect21x21", cv::MORPH_RECT, 21}, {"disc7x7", cv::MORPH_ELLIPSE, 7},
                             {"cross5x5", cv::MORPH_CROSS, 5}};
  for (const MorphCase& c : cases) {
    registerCase<Zel8u>("dilate_8u_C1", c, CV_8UC1, zeliMorphologyBorderGetSize_8u_C1R,
                        zeliMorphologyBorderInit_8u_C1R,
                        [](const Zel8u* s, int ss, Zel8u* d, int ds, ZeliSize r, ZeliBorderType b,
                           const ZeliMorphState* st, Zel8u* buf) {
                          zeliDilateBorder_8u_C1R(s, ss, d, ds, r, b, 0, st, buf);
                        });
    registerCase<Zel32f>("dilate_32f_C1", c, CV_32FC1, zeliMorphologyBorderGetSize_32f_C1R,
                         zeliMorphologyBorderInit_32f_C1R,
                         [](const Zel32f* s, int ss, Zel32f* d, int ds, ZeliSize r, ZeliBorderType b,
                            const ZeliMorphState* st, Zel8u* buf) {
                           zeliDilateBorder_32f_C1R(s, ss, d, ds, r, b, 0.0f, st, buf);
                         });
  }
  registerCase<Zel8u>("dilate_8u_C3", cases[0], CV_8UC3, zeliMorphologyBorderGetSize_8u_C3R,
                      zeliMorphologyBorderInit_8u_C3R,
                      [](const Zel8u* s, int ss, Zel8u* d, int ds, ZeliSize r, ZeliBorderType b,
                         const ZeliMorphState* st, Zel8u* buf) {
                        static const Zel8u value[3] = {0, 0, 0};
                        zeliDilateBorder_8u_C3R(s, ss, d, ds, r, b, value, st, buf);
                      });
}

zelbench::Registrar registrar(&registerMorph);

}  // namespace
