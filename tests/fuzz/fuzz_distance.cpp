// Distance transforms from random feature images and weights. Every row of
// the source is read through a step with padding and every buffer is a block
// of exactly the queried size, so AddressSanitizer sees any access past them.
// Checked: the 3x3 chamfer against the cheapest path found by relaxation
// (weights with a <= b <= 2a, where the two passes are exact), the exact
// transform against a brute-force nearest feature, fast marching within
// [-radius, radius] with the sign of its start values.
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <vector>

#include "fuzz_input.h"
#include "zelcv.h"

namespace {

using zelfuzz::Input;

// Cheapest path cost of 8-neighbour steps from a 0 pixel, saturated at 255.
std::vector<int> cheapestPaths(const std::vector<uint8_t>& src, int w, int h, int step, int a, int b) {
  const int kFar = 1 << 30;
  std::vector<int> d(size_t(w) * size_t(h), kFar);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      if (src[size_t(y) * size_t(step) + size_t(x)] == 0) d[size_t(y) * size_t(w) + size_t(x)] = 0;
  for (bool changed = true; changed;) {  // Bellman-Ford: tiny images only
    changed = false;
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x)
        for (int dy = -1; dy <= 1; ++dy)
          for (int dx = -1; dx <= 1; ++dx) {
            const int nx = x + dx, ny = y + dy;
            if ((dx == 0 && dy == 0) || nx < 0 || ny < 0 || nx >= w || ny >= h) continue;
            const int from = d[size_t(ny) * size_t(w) + size_t(nx)];
            if (from == kFar) continue;
            const int cost = from + (dx != 0 && dy != 0 ? b : a);
            int& to = d[size_t(y) * size_t(w) + size_t(x)];
            if (cost < to) to = cost, changed = true;
          }
  }
  for (int& v : d) v = std::min(v, 255);
  return d;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in(data, size);
  const int w = in.range(1, 24), h = in.range(1, 24), step = w + in.range(0, 7);
  const int density = in.range(1, 64);
  std::vector<uint8_t> src(size_t(step) * size_t(h));
  in.fill(src.data(), src.size());
  for (uint8_t& v : src) v = v < density ? 0 : v;
  const ZeliSize roi{w, h};

  switch (in.range(0, 2)) {
    case 0: {
      const int a = in.range(1, 12), b = in.range(a, 2 * a);
      const Zel32s metrics[2] = {a, b};
      std::vector<uint8_t> dst(size_t(w) * size_t(h));
      if (zeliDistanceTransform_3x3_8u_C1R(src.data(), step, dst.data(), w, roi, metrics) != zelStatusOk) abort();
      const std::vector<int> want = cheapestPaths(src, w, h, step, a, b);
      for (size_t i = 0; i < dst.size(); ++i)
        if (dst[i] != want[i]) abort();
      break;
    }
    case 1: {
      int bytes = 0;
      if (zeliTrueDistanceTransformGetBufferSize_8u32f_C1R(roi, &bytes) != zelStatusOk) abort();
      std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
      std::vector<Zel32f> dst(size_t(w) * size_t(h));
      if (zeliTrueDistanceTransform_8u32f_C1R(src.data(), step, dst.data(), w * 4, roi, buffer.data()) != zelStatusOk)
        abort();
      for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) {
          long long best = -1;
          for (int fy = 0; fy < h; ++fy)
            for (int fx = 0; fx < w; ++fx)
              if (src[size_t(fy) * size_t(step) + size_t(fx)] == 0) {
                const long long d2 = (long long)(fx - x) * (fx - x) + (long long)(fy - y) * (fy - y);
                if (best < 0 || d2 < best) best = d2;
              }
          const float want = best < 0 ? 3.40282347e38f : float(std::sqrt(double(best)));
          if (dst[size_t(y) * size_t(w) + size_t(x)] != want) abort();
        }
      break;
    }
    default: {
      const Zel32f radius = Zel32f(in.range(0, 40)) * 0.25f;
      int bytes = 0;
      if (zeliFastMarchingGetBufferSize_8u32f_C1R(roi, &bytes) != zelStatusOk) abort();
      std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
      std::vector<Zel32f> dst(size_t(w) * size_t(h));
      if (zeliFastMarching_8u32f_C1R(src.data(), step, dst.data(), w * 4, roi, radius, buffer.data()) != zelStatusOk)
        abort();
      for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) {
          const float v = dst[size_t(y) * size_t(w) + size_t(x)];
          const bool feature = src[size_t(y) * size_t(step) + size_t(x)] == 0;
          if (!(v >= -radius && v <= radius)) abort();
          if (feature ? v > 0 : v < 0) abort();  // inside stays at or below 0, outside at or above
        }
      break;
    }
  }
  return 0;
}
