// Integral images against cv::integral: sums; sums and squares; sums,
// squares and tilted sums, with output types matched where both offer them.
// OpenCV dispatches its sum-only integral to 512-bit code where the processor
// has it; to compare like with like (128-bit vectors) run with
//   OPENCV_CPU_DISABLE=AVX512-SKX,AVX2,FMA3,AVX
#include <opencv2/imgproc.hpp>

#include "harness.h"

namespace {

using zelbench::Size;

// Bytes touched: the source once plus every output element written.
int64_t bytesTouched(const Size& s, int outBytesPerPixel) {
  return int64_t(s.width) * s.height * (1 + outBytesPerPixel);
}

void registerIntegral() {
  for (const Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;
    const std::string size = s.name;
    auto image = std::make_shared<cv::Mat>(zelbench::naturalImage(s.width, s.height));

    // Sums only.
    for (int depth : {CV_32S, CV_32F}) {
      const std::string type = depth == CV_32S ? "8u32s" : "8u32f";
      zelbench::registerPair(
          "integral", "sum_" + type + "/" + size,
          [=](benchmark::State& state) {
            cv::Mat sum(s.height + 1, s.width + 1, depth);
            for (auto _ : state) {
              ZelStatus st = depth == CV_32S
                                 ? zeliIntegral_8u32s_C1R(image->data, zelbench::stepOf(*image), sum.ptr<Zel32s>(),
                                                          zelbench::stepOf(sum), zelbench::roiOf(*image), 0)
                                 : zeliIntegral_8u32f_C1R(image->data, zelbench::stepOf(*image), sum.ptr<Zel32f>(),
                                                          zelbench::stepOf(sum), zelbench::roiOf(*image), 0.0f);
              benchmark::DoNotOptimize(st);
              benchmark::ClobberMemory();
            }
            state.SetBytesProcessed(state.iterations() * bytesTouched(s, 4));
          },
          [=](benchmark::State& state) {
            cv::Mat sum(s.height + 1, s.width + 1, depth);
            for (auto _ : state) {
              cv::integral(*image, sum, depth);
              benchmark::ClobberMemory();
            }
            state.SetBytesProcessed(state.iterations() * bytesTouched(s, 4));
          });
    }

    // Sums and squares (64f squares: the only square type both offer).
    for (int depth : {CV_32S, CV_32F}) {
      const std::string type = depth == CV_32S ? "8u32s64f" : "8u32f64f";
      zelbench::registerPair(
          "integral", "sqr_" + type + "/" + size,
          [=](benchmark::State& state) {
            cv::Mat sum(s.height + 1, s.width + 1, depth), sq(s.height + 1, s.width + 1, CV_64F);
            for (auto _ : state) {
              ZelStatus st =
                  depth == CV_32S
                      ? zeliSqrIntegral_8u32s64f_C1R(image->data, zelbench::stepOf(*image), sum.ptr<Zel32s>(),
                                                     zelbench::stepOf(sum), sq.ptr<Zel64f>(), zelbench::stepOf(sq),
                                                     zelbench::roiOf(*image), 0, 0.0)
                      : zeliSqrIntegral_8u32f64f_C1R(image->data, zelbench::stepOf(*image), sum.ptr<Zel32f>(),
                                                     zelbench::stepOf(sum), sq.ptr<Zel64f>(), zelbench::stepOf(sq),
                                                     zelbench::roiOf(*image), 0.0f, 0.0);
              benchmark::DoNotOptimize(st);
              benchmark::ClobberMemory();
            }
            state.SetBytesProcessed(state.iterations() * bytesTouched(s, 12));
          },
          [=](benchmark::State& state) {
            cv::Mat sum(s.height + 1, s.width + 1, depth), sq(s.height + 1, s.width + 1, CV_64F);
            for (auto _ : state) {
              cv::integral(*image, sum, sq, depth, CV_64F);
              benchmark::ClobberMemory();
            }
            state.SetBytesProcessed(state.iterations() * bytesTouched(s, 12));
          });
    }

    // Sums, squares and tilted sums: our squared integral plus our tilted
    // integral against the one call that makes all three.
    for (int depth : {CV_32S, CV_32F}) {
      const std::string type = depth == CV_32S ? "8u32s64f" : "8u32f64f";
      zelbench::registerPair(
          "integral", "tilted_" + type + "/" + size,
          [=](benchmark::State& state) {
            cv::Mat sum(s.height + 1, s.width + 1, depth), sq(s.height + 1, s.width + 1, CV_64F);
            cv::Mat tilted(s.height + 2, s.width + 2, depth, cv::Scalar(0));
            const int is = zelbench::stepOf(*image);
            const ZeliSize roi = zelbench::roiOf(*image);
            for (auto _ : state) {
              ZelStatus st;
              if (depth == CV_32S) {
                st = zeliSqrIntegral_8u32s64f_C1R(image->data, is, sum.ptr<Zel32s>(), zelbench::stepOf(sum),
                                                  sq.ptr<Zel64f>(), zelbench::stepOf(sq), roi, 0, 0.0);
                st |= zeliTiltedIntegral_8u32s_C1R(image->data, is, tilted.ptr<Zel32s>(), zelbench::stepOf(tilted),
                                                   roi, 0);
              } else {
                st = zeliSqrIntegral_8u32f64f_C1R(image->data, is, sum.ptr<Zel32f>(), zelbench::stepOf(sum),
                                                  sq.ptr<Zel64f>(), zelbench::stepOf(sq), roi, 0.0f, 0.0);
                st |= zeliTiltedIntegral_8u32f_C1R(image->data, is, tilted.ptr<Zel32f>(), zelbench::stepOf(tilted),
                                                   roi, 0.0f);
              }
              benchmark::DoNotOptimize(st);
              benchmark::ClobberMemory();
            }
            state.SetBytesProcessed(state.iterations() * bytesTouched(s, 16));
          },
          [=](benchmark::State& state) {
            cv::Mat sum(s.height + 1, s.width + 1, depth), sq(s.height + 1, s.width + 1, CV_64F);
            cv::Mat tilted(s.height + 1, s.width + 1, depth);
            for (auto _ : state) {
              cv::integral(*image, sum, sq, tilted, depth, CV_64F);
              benchmark::ClobberMemory();
            }
            state.SetBytesProcessed(state.iterations() * bytesTouched(s, 16));
          });
    }
  }
}

zelbench::Registrar registrar(&registerIntegral);

}  // namespace
