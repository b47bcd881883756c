// Distance references taken straight from the definitions: the cheapest path
// of chamfer steps from any 0 pixel (a multi-source shortest path over the
// ROI), the squared Euclidean distance to the nearest 0 pixel by exhaustive
// search, and the upwind eikonal scheme iterated as a whole-image (Jacobi)
// update until it stops changing. Plus the feature images the tests draw.
#ifndef ZELCV_TESTS_DISTANCE_REFERENCE_H
#define ZELCV_TESTS_DISTANCE_REFERENCE_H

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <queue>
#include <random>
#include <vector>

#include "support/test_image.h"

namespace zeltest {

enum class Features { Sparse, Dense, One, None, Border };

inline const char* featuresName(Features f) {
  switch (f) {
    case Features::Sparse: return "sparse";
    case Features::Dense: return "dense";
    case Features::One: return "one";
    case Features::None: return "none";
    case Features::Border: return "border";
  }
  return "?";
}

// Non-zero background values with 0 at the features.
inline void drawFeatures(TestImage<uint8_t>& img, Features kind, std::mt19937& rng) {
  const int w = img.width(), h = img.height();
  std::uniform_int_distribution<int> value(1, 255);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) img.at(x, y) = uint8_t(value(rng));
  auto put = [&](int x, int y) { img.at(x, y) = 0; };
  std::uniform_real_distribution<double> u(0, 1);
  switch (kind) {
    case Features::Sparse:
      for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x)
          if (u(rng) < 0.03) put(x, y);
      put(std::uniform_int_distribution<int>(0, w - 1)(rng), std::uniform_int_distribution<int>(0, h - 1)(rng));
      break;
    case Features::Dense:
      for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x)
          if (u(rng) < 0.5) put(x, y);
      break;
    case Features::One:
      put(std::uniform_int_distribution<int>(0, w - 1)(rng), std::uniform_int_distribution<int>(0, h - 1)(rng));
      break;
    case Features::None:
      break;
    case Features::Border:
      for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x)
          if ((x == 0 || y == 0 || x == w - 1 || y == h - 1) && u(rng) < 0.2) put(x, y);
      put(0, h - 1);
      break;
  }
}

// Cheapest chamfer path (orthogonal a, diagonal b, knight c when c > 0) from
// any 0 pixel, inside the ROI; +infinity where no 0 pixel exists.
inline std::vector<double> chamferPathCost(const TestImage<uint8_t>& img, double a, double b, double c) {
  const int w = img.width(), h = img.height();
  std::vector<double> cost(size_t(w) * h, std::numeric_limits<double>::infinity());
  using Item = std::pair<double, int>;
  std::priority_queue<Item, std::vector<Item>, std::greater<Item>> queue;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      if (img.at(x, y) == 0) {
        cost[size_t(y) * w + x] = 0;
        queue.push({0.0, y * w + x});
      }
  struct Step {
    int dx, dy;
    double weight;
  };
  std::vector<Step> steps;
  for (int dy = -2; dy <= 2; ++dy)
    for (int dx = -2; dx <= 2; ++dx) {
      const int ax = std::abs(dx), ay = std::abs(dy);
      if (ax <= 1 && ay <= 1 && ax + ay > 0) steps.push_back({dx, dy, ax + ay == 1 ? a : b});
      if (c > 0 && ax + ay == 3 && ax > 0 && ay > 0) steps.push_back({dx, dy, c});
    }
  while (!queue.empty()) {
    const Item top = queue.top();
    queue.pop();
    if (top.first > cost[size_t(top.second)]) continue;
    const int x = top.second % w, y = top.second / w;
    for (const Step& s : steps) {
      const int nx = x + s.dx, ny = y + s.dy;
      if (nx < 0 || ny < 0 || nx >= w || ny >= h) continue;
      const double next = top.first + s.weight;
      if (next < cost[size_t(ny) * w + nx]) {
        cost[size_t(ny) * w + nx] = next;
        queue.push({next, ny * w + nx});
      }
    }
  }
  return cost;
}

// Squared distance to the nearest 0 pixel; -1 where there is none.
inline std::vector<int64_t> squaredDistances(const TestImage<uint8_t>& img) {
  const int w = img.width(), h = img.height();
  std::vector<std::pair<int, int>> features;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      if (img.at(x, y) == 0) features.push_back({x, y});
  std::vector<int64_t> d2(size_t(w) * h, -1);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      int64_t best = -1;
      for (const auto& f : features) {
        const int64_t dx = x - f.first, dy = y - f.second, v = dx * dx + dy * dy;
        if (best < 0 || v < best) best = v;
      }
      d2[size_t(y) * w + x] = best;
    }
  return d2;
}

// The upwind eikonal scheme over every pairing of a horizontal and a vertical
// neighbour, iterated over the whole image at once until nothing changes.
inline std::vector<float> eikonalReference(const TestImage<uint8_t>& img, float r) {
  const int w = img.width(), h = img.height();
  auto inside = [&](int x, int y) { return img.at(x, y) == 0; };
  std::vector<float> u(size_t(w) * h);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      bool boundary = false;
      if (inside(x, y))
        for (auto d : {std::pair<int, int>{-1, 0}, {1, 0}, {0, -1}, {0, 1}}) {
          const int nx = x + d.first, ny = y + d.second;
          if (nx >= 0 && ny >= 0 && nx < w && ny < h && !inside(nx, ny)) boundary = true;
        }
      u[size_t(y) * w + x] = !inside(x, y) ? r : boundary ? 0.0f : -r;
    }
  for (bool changed = true; changed;) {
    changed = false;
    std::vector<float> next = u;
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        const bool in = inside(x, y);
        const float outer = in ? -r : r;
        auto at = [&](int nx, int ny) { return nx >= 0 && ny >= 0 && nx < w && ny < h ? u[size_t(ny) * w + nx] : outer; };
        // Every pairing of a horizontal and a vertical neighbour.
        float& v = next[size_t(y) * w + x];
        float nv = v;
        for (int sx : {-1, 1})
          for (int sy : {-1, 1}) {
            float t1 = at(x + sx, y), t2 = at(x, y + sy);
            if (!in) {
              t1 = std::max(0.0f, t1);
              t2 = std::max(0.0f, t2);
            } else if (t1 > 0 || t2 > 0 || (t1 == 0 && t2 == 0)) {
              continue;
            }
            const double d = double(t1) - t2, sign = in ? -1 : 1;
            const double c = std::fabs(d) < 1 ? (double(t1) + t2 + sign * std::sqrt(2 - d * d)) / 2
                                              : (in ? std::max(t1, t2) : std::min(t1, t2)) + sign;
            nv = in ? std::max(nv, float(c)) : std::min(nv, float(c));
          }
        if (std::fabs(nv - v) > 1e-6f) changed = true;
        v = nv;
      }
    u = next;
  }
  return u;
}

}  // namespace zeltest

#endif  // ZELCV_TESTS_DISTANCE_REFERENCE_H
