// A synthetic video for the background models: a smooth colour background
// that drifts slowly in brightness, per-frame Gaussian noise, and three
// moving objects (two discs and a box) whose union is the true mask.
#ifndef ZELCV_TESTS_BACKGROUND_VIDEO_H
#define ZELCV_TESTS_BACKGROUND_VIDEO_H

#include <cmath>
#include <cstdint>
#include <random>
#include <vector>

namespace bgvideo {

struct Video {
  int width, height;
  std::vector<std::vector<uint8_t>> frames;  // 8u C3, rows packed
  std::vector<std::vector<uint8_t>> truth;   // 255 on objects
};

inline Video make(int width, int height, int count, double noiseSigma = 4.0, uint32_t seed = 5) {
  Video v{width, height, {}, {}};
  std::mt19937 rng(seed);
  std::normal_distribution<double> noise(0.0, noiseSigma);
  const double colours[3][3] = {{220, 40, 40}, {30, 200, 60}, {40, 60, 230}};
  const double w = width, h = height;
  for (int t = 0; t < count; ++t) {
    std::vector<uint8_t> f(size_t(width) * height * 3), m(size_t(width) * height);
    const double drift = 6.0 * std::sin(t * 0.03);
    // Object centres move along closed paths; sizes scale with the frame.
    const double cx[3] = {w * (0.5 + 0.35 * std::sin(t * 0.07)), w * (0.5 + 0.3 * std::cos(t * 0.05 + 1)),
                          w * (0.5 + 0.4 * std::sin(t * 0.04 + 2))};
    const double cy[3] = {h * (0.5 + 0.3 * std::cos(t * 0.07)), h * (0.5 + 0.35 * std::sin(t * 0.06)),
                          h * (0.3 + 0.1 * std::cos(t * 0.09))};
    const double r = 0.08 * (w < h ? w : h);
    for (int y = 0; y < height; ++y)
      for (int x = 0; x < width; ++x) {
        int obj = -1;
        for (int o = 0; o < 2; ++o)
          if ((x - cx[o]) * (x - cx[o]) + (y - cy[o]) * (y - cy[o]) <= r * r) obj = o;
        if (std::fabs(x - cx[2]) <= 1.5 * r && std::fabs(y - cy[2]) <= 0.7 * r) obj = 2;
        m[size_t(y) * width + x] = obj >= 0 ? 255 : 0;
        for (int c = 0; c < 3; ++c) {
          double base = 110 + 50 * std::sin(x * 0.045 + 1.7 * c) * std::cos(y * 0.06 - c) + 25 * c + drift;
          if (obj >= 0) base = colours[obj][c] + 15 * std::sin(x * 0.3) * std::cos(y * 0.3);
          const double val = std::floor(base + noise(rng) + 0.5);
          f[(size_t(y) * width + x) * 3 + c] = uint8_t(val < 0 ? 0 : val > 255 ? 255 : val);
        }
      }
    v.frames.push_back(std::move(f));
    v.truth.push_back(std::move(m));
  }
  return v;
}

struct Score {
  long long tp = 0, fp = 0, fn = 0;
  void add(const std::vector<uint8_t>& mask, const std::vector<uint8_t>& truth) {
    for (size_t i = 0; i < mask.size(); ++i) {
      const bool f = mask[i] != 0, t = truth[i] != 0;
      tp += f && t;
      fp += f && !t;
      fn += !f && t;
    }
  }
  double precision() const { return tp + fp ? double(tp) / double(tp + fp) : 1.0; }
  double recall() const { return tp + fn ? double(tp) / double(tp + fn) : 1.0; }
};

}  // namespace bgvideo

#endif  // ZELCV_TESTS_BACKGROUND_VIDEO_H
