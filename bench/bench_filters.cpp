// Derivative and smoothing filters against OpenCV: Sobel and Scharr 8u->16s
// and 32f, the Laplacian, the box lowpass and the Gaussian filter (5x5 and
// 9x9), all replicating the border, at the two picture sizes.
#include <opencv2/imgproc.hpp>

#include <functional>
#include <string>
#include <vector>

#include "harness.h"

namespace {

using Filter8u16s = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, Zel16s*, int, ZeliSize, int, ZeliBorderType, Zel8u,
                                           Zel8u*);
using Filter32f = ZelStatus(ZELCV_CALL*)(const Zel32f*, int, Zel32f*, int, ZeliSize, int, ZeliBorderType, Zel32f,
                                         Zel8u*);
using Query = ZelStatus(ZELCV_CALL*)(ZeliSize, int, int*);

cv::Mat floatImage(int w, int h) {
  cv::Mat f;
  zelbench::naturalImage(w, h).convertTo(f, CV_32F, 1.0 / 255);
  return f;
}

template <typename Fn, typename S, typename D>
void runOurs(benchmark::State& state, Fn f, Query q, const cv::Mat& src, cv::Mat& dst, int mask) {
  int bytes = 0;
  q(zelbench::roiOf(src), mask, &bytes);
  std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
  for (auto _ : state) {
    if (f(src.ptr<S>(), zelbench::stepOf(src), dst.ptr<D>(), zelbench::stepOf(dst), zelbench::roiOf(src), mask,
          zelBorderReplicate, 0, buffer.data()) != zelStatusOk)
      state.SkipWithError("filter failed");
    benchmark::ClobberMemory();
  }
}

void runTheirs(benchmark::State& state, const std::function<void()>& f) {
  for (auto _ : state) {
    f();
    benchmark::ClobberMemory();
  }
}

void registerFilters() {
  struct Case {
    const char* name;
    Filter8u16s f16;
    Query q16;
    Filter32f f32;
    Query q32;
    int ksize;
    std::function<void(const cv::Mat&, cv::Mat&, int depth)> cv;
  };
  const auto sobel = [](int dx, int dy, int k) {
    return [=](const cv::Mat& s, cv::Mat& d, int depth) { cv::Sobel(s, d, depth, dx, dy, k, 1, 0, cv::BORDER_REPLICATE); };
  };
  const std::vector<Case> cases = {
      {"sobel_negvert_3x3", zeliFilterSobelNegVertBorder_8u16s_C1R, zeliFilterSobelNegVertGetBufferSize_8u16s_C1R,
       zeliFilterSobelNegVertBorder_32f_C1R, zeliFilterSobelNegVertGetBufferSize_32f_C1R, 3, sobel(1, 0, 3)},
      {"sobel_negvert_5x5", zeliFilterSobelNegVertBorder_8u16s_C1R, zeliFilterSobelNegVertGetBufferSize_8u16s_C1R,
       zeliFilterSobelNegVertBorder_32f_C1R, zeliFilterSobelNegVertGetBufferSize_32f_C1R, 5, sobel(1, 0, 5)},
      {"sobel_cross_3x3", zeliFilterSobelCrossBorder_8u16s_C1R, zeliFilterSobelCrossGetBufferSize_8u16s_C1R,
       zeliFilterSobelCrossBorder_32f_C1R, zeliFilterSobelCrossGetBufferSize_32f_C1R, 3, sobel(1, 1, 3)},
      {"sobel_horizsecond_5x5", zeliFilterSobelHorizSecondBorder_8u16s_C1R,
       zeliFilterSobelHorizSecondGetBufferSize_8u16s_C1R, zeliFilterSobelHorizSecondBorder_32f_C1R,
       zeliFilterSobelHorizSecondGetBufferSize_32f_C1R, 5, sobel(0, 2, 5)},
      {"scharr_vert_3x3", zeliFilterScharrVertBorder_8u16s_C1R, zeliFilterScharrVertGetBufferSize_8u16s_C1R,
       zeliFilterScharrVertBorder_32f_C1R, zeliFilterScharrVertGetBufferSize_32f_C1R, 3,
       [](const cv::Mat& s, cv::Mat& d, int depth) { cv::Scharr(s, d, depth, 1, 0, 1, 0, cv::BORDER_REPLICATE); }},
      {"laplacian_3x3", zeliFilterLaplacianBorder_8u16s_C1R, zeliFilterLaplacianGetBufferSize_8u16s_C1R,
       zeliFilterLaplacianBorder_32f_C1R, zeliFilterLaplacianGetBufferSize_32f_C1R, 3,
       [](const cv::Mat& s, cv::Mat& d, int depth) { cv::Laplacian(s, d, depth, 3, 1, 0, cv::BORDER_REPLICATE); }},
      {"laplacian_5x5", zeliFilterLaplacianBorder_8u16s_C1R, zeliFilterLaplacianGetBufferSize_8u16s_C1R,
       zeliFilterLaplacianBorder_32f_C1R, zeliFilterLaplacianGetBufferSize_32f_C1R, 5,
       [](const cv::Mat& s, cv::Mat& d, int depth) { cv::Laplacian(s, d, depth, 5, 1, 0, cv::BORDER_REPLICATE); }},
  };
  for (const zelbench::Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;
    for (const Case& c : cases) {
      const int mask = c.ksize == 5 ? zelMaskSize5x5 : zelMaskSize3x3;
      zelbench::registerPair(
          "filters", std::string(c.name) + "_8u16s/" + s.name,
          [s, c, mask](benchmark::State& state) {
            cv::Mat src = zelbench::naturalImage(s.width, s.height), dst(s.height, s.width, CV_16S);
            runOurs<Filter8u16s, Zel8u, Zel16s>(state, c.f16, c.q16, src, dst, mask);
          },
          [s, c](benchmark::State& state) {
            cv::Mat src = zelbench::naturalImage(s.width, s.height), dst(s.height, s.width, CV_16S);
            runTheirs(state, [&] { c.cv(src, dst, CV_16S); });
          });
      zelbench::registerPair(
          "filters", std::string(c.name) + "_32f/" + s.name,
          [s, c, mask](benchmark::State& state) {
            cv::Mat src = floatImage(s.width, s.height), dst(s.height, s.width, CV_32F);
            runOurs<Filter32f, Zel32f, Zel32f>(state, c.f32, c.q32, src, dst, mask);
          },
          [s, c](benchmark::State& state) {
            cv::Mat src = floatImage(s.width, s.height), dst(s.height, s.width, CV_32F);
            runTheirs(state, [&] { c.cv(src, dst, CV_32F); });
          });
    }
    for (int k : {3, 5}) {
      const int mask = k == 5 ? zelMaskSize5x5 : zelMaskSize3x3;
      zelbench::registerPair(
          "filters", "lowpass_" + std::to_string(k) + "x" + std::to_string(k) + "_8u/" + s.name,
          [s, mask](benchmark::State& state) {
            cv::Mat src = zelbench::naturalImage(s.width, s.height), dst(s.height, s.width, CV_8U);
            runOurs<decltype(&zeliFilterLowpassBorder_8u_C1R), Zel8u, Zel8u>(
                state, zeliFilterLowpassBorder_8u_C1R, zeliFilterLowpassGetBufferSize_8u_C1R, src, dst, mask);
          },
          [s, k](benchmark::State& state) {
            cv::Mat src = zelbench::naturalImage(s.width, s.height), dst(s.height, s.width, CV_8U);
            runTheirs(state, [&] { cv::blur(src, dst, cv::Size(k, k), cv::Point(-1, -1), cv::BORDER_REPLICATE); });
          });
    }
    struct Gauss {
      int k, type, depth;
      const char* name;
    };
    for (const Gauss g : {Gauss{5, zel8u, CV_8U, "8u"}, Gauss{9, zel8u, CV_8U, "8u"}, Gauss{5, zel32f, CV_32F, "32f"},
                          Gauss{9, zel32f, CV_32F, "32f"}}) {
      const std::string name = "gaussian_" + std::to_string(g.k) + "x" + std::to_string(g.k) + "_" + g.name + "/" + s.name;
      const float sigma = g.k == 5 ? 1.1f : 1.7f;
      zelbench::registerPair(
          "filters", name,
          [s, g, sigma](benchmark::State& state) {
            cv::Mat src = zelbench::naturalImage(s.width, s.height);
            if (g.depth == CV_32F) src = floatImage(s.width, s.height);
            cv::Mat dst(s.height, s.width, src.type());
            int st = 0, bu = 0;
            const ZeliSize roi = zelbench::roiOf(src);
            zeliFilterGaussianGetBufferSize(roi, g.k, g.type, 1, &st, &bu);
            std::vector<Zel8u> gaussian(static_cast<size_t>(st)), buffer(static_cast<size_t>(bu));
            auto* state0 = reinterpret_cast<ZeliFilterGaussianState*>(gaussian.data());
            zeliFilterGaussianInit(roi, sigma, g.k, g.type, 1, state0);
            for (auto _ : state) {
              const ZelStatus r =
                  g.depth == CV_8U
                      ? zeliFilterGaussianBorder_8u_C1R(src.ptr<Zel8u>(), zelbench::stepOf(src), dst.ptr<Zel8u>(),
                                                        zelbench::stepOf(dst), roi, zelBorderReplicate, 0, state0,
                                                        buffer.data())
                      : zeliFilterGaussianBorder_32f_C1R(src.ptr<Zel32f>(), zelbench::stepOf(src), dst.ptr<Zel32f>(),
                                                         zelbench::stepOf(dst), roi, zelBorderReplicate, 0.0f, state0,
                                                         buffer.data());
              if (r != zelStatusOk) state.SkipWithError("Gaussian failed");
              benchmark::ClobberMemory();
            }
          },
          [s, g, sigma](benchmark::State& state) {
            cv::Mat src = zelbench::naturalImage(s.width, s.height);
            if (g.depth == CV_32F) src = floatImage(s.width, s.height);
            cv::Mat dst(s.height, s.width, src.type());
            runTheirs(state,
                      [&] { cv::GaussianBlur(src, dst, cv::Size(g.k, g.k), sigma, sigma, cv::BORDER_REPLICATE); });
          });
    }
  }
}

zelbench::Registrar registrar(&registerFilters);

}  // namespace
