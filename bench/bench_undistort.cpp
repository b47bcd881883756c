// Lens undistortion against cv::undistort, and resampling through a prebuilt
// pair of float coordinate maps against cv::remap (bilinear, constant border)
// given the same maps.
#include <memory>
#include <vector>

#include <opencv2/calib3d.hpp>
#include <opencv2/imgproc.hpp>

#include "harness.h"

namespace {

using zelbench::Size;

struct Case {
  const char* name;
  int cvType;
  ZelStatus (*undistort)(const Zel8u*, int, Zel8u*, int, ZeliSize, Zel32f, Zel32f, Zel32f, Zel32f, Zel32f, Zel32f,
                         Zel32f, Zel32f, Zel8u*);
  ZelStatus (*remap)(const Zel8u*, int, ZeliSize, const Zel32f*, int, const Zel32f*, int, Zel8u*, int, ZeliSize);
};

// The float members take Zel32f pointers; the benchmark passes bytes.
template <typename T, ZelStatus (*F)(const T*, int, T*, int, ZeliSize, Zel32f, Zel32f, Zel32f, Zel32f, Zel32f,
                                     Zel32f, Zel32f, Zel32f, Zel8u*)>
ZelStatus undistortBytes(const Zel8u* s, int ss, Zel8u* d, int ds, ZeliSize r, Zel32f fx, Zel32f fy, Zel32f cx,
                         Zel32f cy, Zel32f k1, Zel32f k2, Zel32f p1, Zel32f p2, Zel8u* b) {
  return F(reinterpret_cast<const T*>(s), ss, reinterpret_cast<T*>(d), ds, r, fx, fy, cx, cy, k1, k2, p1, p2, b);
}
template <typename T, ZelStatus (*F)(const T*, int, ZeliSize, const Zel32f*, int, const Zel32f*, int, T*, int,
                                     ZeliSize)>
ZelStatus remapBytes(const Zel8u* s, int ss, ZeliSize sz, const Zel32f* x, int xs, const Zel32f* y, int ys, Zel8u* d,
                     int ds, ZeliSize r) {
  return F(reinterpret_cast<const T*>(s), ss, sz, x, xs, y, ys, reinterpret_cast<T*>(d), ds, r);
}

const Case kCases[] = {
    {"8u_C1", CV_8UC1, zeliUndistortRadial_8u_C1R, zeliRemapBilinear_8u_C1R},
    {"8u_C3", CV_8UC3, zeliUndistortRadial_8u_C3R, zeliRemapBilinear_8u_C3R},
    {"32f_C1", CV_32FC1, undistortBytes<Zel32f, zeliUndistortRadial_32f_C1R>,
     remapBytes<Zel32f, zeliRemapBilinear_32f_C1R>},
    {"32f_C3", CV_32FC3, undistortBytes<Zel32f, zeliUndistortRadial_32f_C3R>,
     remapBytes<Zel32f, zeliRemapBilinear_32f_C3R>},
};

// A barrel lens scaled to the picture.
struct Lens {
  float fx, fy, cx, cy, k1, k2, p1, p2;
};
Lens lensFor(const Size& s) {
  const float scale = float(s.width) / 640.0f;
  return {520.0f * scale, 520.0f * scale, s.width * 0.5f - 0.5f, s.height * 0.5f + 1.0f, -0.28f, 0.07f, 0.001f,
          -0.0008f};
}

void registerUndistort() {
  for (const Size& s : zelbench::kSizes) {
    if (s.width > 1920) continue;
    const std::string size = s.name;
    const Lens l = lensFor(s);
    const cv::Mat camera = (cv::Mat_<double>(3, 3) << l.fx, 0, l.cx, 0, l.fy, l.cy, 0, 0, 1);
    const cv::Mat coefficients = (cv::Mat_<double>(1, 4) << l.k1, l.k2, l.p1, l.p2);
    auto maps = std::make_shared<std::pair<cv::Mat, cv::Mat>>();
    cv::initUndistortRectifyMap(camera, coefficients, cv::Mat(), camera, cv::Size(s.width, s.height), CV_32FC1,
                                maps->first, maps->second);
    for (const Case& c : kCases) {
      auto image = std::make_shared<cv::Mat>(zelbench::randomMat(s.width, s.height, c.cvType));
      const Case cs = c;
      zelbench::registerPair(
          "undistort", std::string("undistort_") + c.name + "/" + size,
          [=](benchmark::State& state) {
            int bytes = 0;
            zeliUndistortGetSize(zelbench::roiOf(*image), &bytes);
            std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
            cv::Mat dst(image->size(), cs.cvType);
            for (auto _ : state) {
              ZelStatus st = cs.undistort(image->data, zelbench::stepOf(*image), dst.data, zelbench::stepOf(dst),
                                          zelbench::roiOf(*image), l.fx, l.fy, l.cx, l.cy, l.k1, l.k2, l.p1, l.p2,
                                          buffer.data());
              benchmark::DoNotOptimize(st);
              benchmark::ClobberMemory();
            }
          },
          [=](benchmark::State& state) {
            cv::Mat dst(image->size(), cs.cvType);
            for (auto _ : state) {
              cv::undistort(*image, dst, camera, coefficients);
              benchmark::ClobberMemory();
            }
          });
      zelbench::registerPair(
          "undistort", std::string("remap_") + c.name + "/" + size,
          [=](benchmark::State& state) {
            cv::Mat dst(image->size(), cs.cvType);
            const cv::Mat& mx = maps->first;
            const cv::Mat& my = maps->second;
            for (auto _ : state) {
              ZelStatus st = cs.remap(image->data, zelbench::stepOf(*image), zelbench::roiOf(*image),
                                      mx.ptr<Zel32f>(), zelbench::stepOf(mx), my.ptr<Zel32f>(), zelbench::stepOf(my),
                                      dst.data, zelbench::stepOf(dst), zelbench::roiOf(dst));
              benchmark::DoNotOptimize(st);
              benchmark::ClobberMemory();
            }
          },
          [=](benchmark::State& state) {
            cv::Mat dst(image->size(), cs.cvType);
            for (auto _ : state) {
              cv::remap(*image, dst, maps->first, maps->second, cv::INTER_LINEAR, cv::BORDER_CONSTANT);
              benchmark::ClobberMemory();
            }
          });
    }
  }
}

zelbench::Registrar registrar(&registerUndistort);

}  // namespace
