// Corner measures, FAST and Hough lines against their OpenCV counterparts at
// the two picture sizes: cornerMinEigenVal, cornerHarris and
// cornerEigenValsAndVecs (8u and 32f sources, 3x3 Sobel, 3x3 block,
// replicated border), FAST (16-pixel circle, arc 9, threshold 20, with
// suppression), HoughLines and HoughLinesP on the Canny edges of the picture.
#include <opencv2/features2d.hpp>
#include <opencv2/imgproc.hpp>

#include <string>
#include <vector>

#include "harness.h"

namespace {

enum class Corner { kMinEigen, kHarris, kEigen };

ZelStatus runCorner(Corner c, const cv::Mat& src, cv::Mat& dst, Zel8u* buffer) {
  const ZeliSize roi = zelbench::roiOf(src);
  const int ss = zelbench::stepOf(src), ds = zelbench::stepOf(dst);
  Zel32f* out = dst.ptr<Zel32f>();
  if (src.depth() == CV_8U) {
    const Zel8u* in = src.ptr<Zel8u>();
    if (c == Corner::kMinEigen)
      return zeliMinEigenVal_8u32f_C1R(in, ss, out, ds, roi, zelFilterSobel, zelMaskSize3x3, 3, zelBorderReplicate, 0,
                                       buffer);
    if (c == Corner::kHarris)
      return zeliHarrisCorner_8u32f_C1R(in, ss, out, ds, roi, zelFilterSobel, zelMaskSize3x3, 3, 0.04f,
                                        zelBorderReplicate, 0, buffer);
    return zeliEigenValsVecs_8u32f_C1R(in, ss, out, ds, roi, zelFilterSobel, zelMaskSize3x3, 3, zelBorderReplicate, 0,
                                       buffer);
  }
  const Zel32f* in = src.ptr<Zel32f>();
  if (c == Corner::kMinEigen)
    return zeliMinEigenVal_32f_C1R(in, ss, out, ds, roi, zelFilterSobel, zelMaskSize3x3, 3, zelBorderReplicate, 0.0f,
                                   buffer);
  if (c == Corner::kHarris)
    return zeliHarrisCorner_32f_C1R(in, ss, out, ds, roi, zelFilterSobel, zelMaskSize3x3, 3, 0.04f,
                                    zelBorderReplicate, 0.0f, buffer);
  return zeliEigenValsVecs_32f_C1R(in, ss, out, ds, roi, zelFilterSobel, zelMaskSize3x3, 3, zelBorderReplicate, 0.0f,
                                   buffer);
}

cv::Mat edgesOf(const cv::Mat& picture) {
  cv::Mat edges;
  cv::Canny(picture, edges, 60, 180);
  return edges;
}

void registerFeatures() {
  for (const zelbench::Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;
    const struct {
      const char* name;
      Corner corner;
    } corners[] = {{"min_eigen", Corner::kMinEigen}, {"harris", Corner::kHarris}, {"eigen_vecs", Corner::kEigen}};
    for (const auto& c : corners)
      for (int depth : {CV_8U, CV_32F}) {
        const std::string name = std::string(c.name) + (depth == CV_8U ? "_8u32f/" : "_32f/") + s.name;
        const Corner corner = c.corner;
        auto source = [s, depth]() {
          cv::Mat picture = zelbench::naturalImage(s.width, s.height), f;
          if (depth == CV_8U) return picture;
          picture.convertTo(f, CV_32F, 1.0 / 255);
          return f;
        };
        zelbench::registerPair(
            "features", name,
            [s, corner, source](benchmark::State& state) {
              cv::Mat src = source();
              cv::Mat dst(s.height, s.width, corner == Corner::kEigen ? CV_32FC(6) : CV_32FC1);
              int bytes = 0;
              zeliHarrisCornerGetBufferSize(zelbench::roiOf(src), zelMaskSize3x3, 3, &bytes);
              std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
              for (auto _ : state) {
                if (runCorner(corner, src, dst, buffer.data()) != zelStatusOk) state.SkipWithError("corner failed");
                benchmark::ClobberMemory();
              }
            },
            [s, corner, source](benchmark::State& state) {
              cv::Mat src = source(), dst;
              for (auto _ : state) {
                if (corner == Corner::kMinEigen) cv::cornerMinEigenVal(src, dst, 3, 3, cv::BORDER_REPLICATE);
                else if (corner == Corner::kHarris) cv::cornerHarris(src, dst, 3, 3, 0.04, cv::BORDER_REPLICATE);
                else cv::cornerEigenValsAndVecs(src, dst, 3, 3, cv::BORDER_REPLICATE);
                benchmark::ClobberMemory();
              }
            });
      }

    zelbench::registerPair(
        "features", std::string("fast9/") + s.name,
        [s](benchmark::State& state) {
          cv::Mat src = zelbench::naturalImage(s.width, s.height);
          cv::Mat corner(s.height, s.width, CV_8UC1), score(s.height, s.width, CV_8UC1);
          int stateBytes = 0, bytes = 0;
          zeliFastNGetSize(&stateBytes);
          std::vector<Zel8u> st(static_cast<size_t>(stateBytes));
          auto* fast = reinterpret_cast<ZeliFastNState*>(st.data());
          zeliFastNInit(3, 9, 20, 1, fast);
          zeliFastNGetBufferSize(zelbench::roiOf(src), &bytes);
          std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
          std::vector<ZeliPoint> points(size_t(s.width) * s.height / 4);
          std::vector<Zel8u> scores(points.size());
          for (auto _ : state) {
            int count = 0;
            ZelStatus status = zeliFastN_8u_C1R(src.data, zelbench::stepOf(src), corner.data, zelbench::stepOf(corner),
                                                score.data, zelbench::stepOf(score), zelbench::roiOf(src), fast,
                                                buffer.data());
            status |= zeliFastN2DToVec_8u(corner.data, zelbench::stepOf(corner), score.data, zelbench::stepOf(score),
                                          zelbench::roiOf(src), points.data(), scores.data(), int(points.size()),
                                          &count);
            if (status != zelStatusOk) state.SkipWithError("FAST failed");
            benchmark::DoNotOptimize(count);
          }
        },
        [s](benchmark::State& state) {
          cv::Mat src = zelbench::naturalImage(s.width, s.height);
          std::vector<cv::KeyPoint> keypoints;
          for (auto _ : state) {
            cv::FAST(src, keypoints, 20, true, cv::FastFeatureDetector::TYPE_9_16);
            benchmark::DoNotOptimize(keypoints.data());
          }
        });

    const float theta = float(CV_PI / 180);
    zelbench::registerPair(
        "features", std::string("hough_lines/") + s.name,
        [s, theta](benchmark::State& state) {
          cv::Mat src = edgesOf(zelbench::naturalImage(s.width, s.height));
          int bytes = 0;
          zeliHoughLineGetSize_8u_C1R(zelbench::roiOf(src), {1.0f, theta}, &bytes);
          std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
          std::vector<ZeliPoint_32f> lines(100000);
          for (auto _ : state) {
            int count = 0;
            if (zeliHoughLine_8u32f_C1R(src.data, zelbench::stepOf(src), zelbench::roiOf(src), {1.0f, theta}, 150,
                                        lines.data(), int(lines.size()), &count, buffer.data()) != zelStatusOk)
              state.SkipWithError("HoughLine failed");
            benchmark::DoNotOptimize(count);
          }
        },
        [s, theta](benchmark::State& state) {
          cv::Mat src = edgesOf(zelbench::naturalImage(s.width, s.height));
          std::vector<cv::Vec2f> lines;
          for (auto _ : state) {
            cv::HoughLines(src, lines, 1, theta, 150);
            benchmark::DoNotOptimize(lines.data());
          }
        });
    zelbench::registerPair(
        "features", std::string("hough_prob/") + s.name,
        [s, theta](benchmark::State& state) {
          cv::Mat src = edgesOf(zelbench::naturalImage(s.width, s.height));
          int bytes = 0;
          zeliHoughProbLineGetSize_8u_C1R(zelbench::roiOf(src), {1.0f, theta}, &bytes);
          std::vector<Zel8u> st(static_cast<size_t>(bytes));
          auto* prob = reinterpret_cast<ZeliHoughProbState*>(st.data());
          zeliHoughProbLineInit_8u32f_C1R(zelbench::roiOf(src), {1.0f, theta}, 1u, prob);
          std::vector<ZeliPoint> segments(200000);
          for (auto _ : state) {
            int count = 0;
            if (zeliHoughProbLine_8u32f_C1R(src.data, zelbench::stepOf(src), zelbench::roiOf(src), 50, 30, 5,
                                            segments.data(), 100000, &count, prob) != zelStatusOk)
              state.SkipWithError("HoughProbLine failed");
            benchmark::DoNotOptimize(count);
          }
        },
        [s, theta](benchmark::State& state) {
          cv::Mat src = edgesOf(zelbench::naturalImage(s.width, s.height));
          std::vector<cv::Vec4i> lines;
          for (auto _ : state) {
            cv::HoughLinesP(src, lines, 1, theta, 50, 30, 5);
            benchmark::DoNotOptimize(lines.data());
          }
        });
  }
}

zelbench::Registrar registrar(&registerFeatures);

}  // namespace
