// Distance transforms against cv::distanceTransform on the same feature image
// (the 0 pixels of a thresholded picture): the chamfer masks with float
// results (L2 with masks 3 and 5, L1 with mask 3), L1 with 8-bit results, and
// the exact Euclidean transform against DIST_MASK_PRECISE.
#include <opencv2/imgproc.hpp>

#include <memory>

#include "harness.h"

namespace {

using zelbench::Size;

// About one pixel in eight is a feature, in blobs: the dark parts of the
// natural picture.
cv::Mat featureImage(const Size& s) {
  cv::Mat img = zelbench::naturalImage(s.width, s.height), bin;
  cv::threshold(img, bin, 60, 255, cv::THRESH_BINARY);
  return bin;
}

void registerDistance() {
  for (const Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;
    const std::string size = s.name;
    auto src = std::make_shared<cv::Mat>(featureImage(s));

    struct Chamfer {
      const char* name;
      int type, mask, kerSize, norm;
    } chamfers[] = {{"L2_mask3_32f", cv::DIST_L2, 3, 3, 2},
                    {"L2_mask5_32f", cv::DIST_L2, 5, 5, 2},
                    {"L1_mask3_32f", cv::DIST_L1, 3, 3, 1}};
    for (const Chamfer& c : chamfers) {
      zelbench::registerPair(
          "distance", std::string(c.name) + "/" + size,
          [=](benchmark::State& state) {
            cv::Mat dst(s.height, s.width, CV_32FC1);
            Zel32f metrics[3];
            zeliGetDistanceTransformMask_32f(c.kerSize, c.norm, metrics);
            for (auto _ : state) {
              ZelStatus st = (c.kerSize == 3 ? zeliDistanceTransform_3x3_8u32f_C1R : zeliDistanceTransform_5x5_8u32f_C1R)(
                  src->data, zelbench::stepOf(*src), dst.ptr<Zel32f>(), zelbench::stepOf(dst), zelbench::roiOf(*src),
                  metrics);
              benchmark::DoNotOptimize(st);
              benchmark::ClobberMemory();
            }
          },
          [=](benchmark::State& state) {
            cv::Mat dst(s.height, s.width, CV_32FC1);
            for (auto _ : state) {
              cv::distanceTransform(*src, dst, c.type, c.mask, CV_32F);
              benchmark::ClobberMemory();
            }
          });
    }

    zelbench::registerPair(
        "distance", "L1_mask3_8u/" + size,
        [=](benchmark::State& state) {
          cv::Mat dst(s.height, s.width, CV_8UC1);
          const Zel32s metrics[2] = {1, 2};
          for (auto _ : state) {
            ZelStatus st = zeliDistanceTransform_3x3_8u_C1R(src->data, zelbench::stepOf(*src), dst.data,
                                                            zelbench::stepOf(dst), zelbench::roiOf(*src), metrics);
            benchmark::DoNotOptimize(st);
            benchmark::ClobberMemory();
          }
        },
        [=](benchmark::State& state) {
          cv::Mat dst(s.height, s.width, CV_8UC1);
          for (auto _ : state) {
            cv::distanceTransform(*src, dst, cv::DIST_L1, 3, CV_8U);
            benchmark::ClobberMemory();
          }
        });

    zelbench::registerPair(
        "distance", "L2_precise_32f/" + size,
        [=](benchmark::State& state) {
          cv::Mat dst(s.height, s.width, CV_32FC1);
          int bytes = 0;
          zeliTrueDistanceTransformGetBufferSize_8u32f_C1R(zelbench::roiOf(*src), &bytes);
          std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
          for (auto _ : state) {
            ZelStatus st = zeliTrueDistanceTransform_8u32f_C1R(src->data, zelbench::stepOf(*src), dst.ptr<Zel32f>(),
                                                               zelbench::stepOf(dst), zelbench::roiOf(*src),
                                                               buffer.data());
            benchmark::DoNotOptimize(st);
            benchmark::ClobberMemory();
          }
        },
        [=](benchmark::State& state) {
          cv::Mat dst(s.height, s.width, CV_32FC1);
          for (auto _ : state) {
            cv::distanceTransform(*src, dst, cv::DIST_L2, cv::DIST_MASK_PRECISE, CV_32F);
            benchmark::ClobberMemory();
          }
        });
  }
}

zelbench::Registrar registrar(&registerDistance);

}  // namespace
