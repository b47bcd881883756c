// Labelling, speckles, watershed, gradient segmentation and boundaries on
// images drawn from the fuzzer's bytes. The bytes choose the size, padding,
// parameters and pixels; labelling is compared with a plain flood labelling,
// and the flooding results must keep every seed and use only seed labels,
// 0 and the boundary value.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "fuzz_input.h"
#include "zelcv.h"

namespace {

using zelfuzz::Input;

// Equal non-zero values, numbered by first pixel in raster order.
std::vector<int> floodLabels(const std::vector<uint8_t>& img, int w, int h, bool conn8, int& count) {
  std::vector<int> lab(img.size(), 0), stack;
  count = 0;
  for (size_t s = 0; s < img.size(); ++s) {
    if (!img[s] || lab[s]) continue;
    lab[s] = ++count;
    stack.assign(1, int(s));
    while (!stack.empty()) {
      const int p = stack.back();
      stack.pop_back();
      const int x = p % w, y = p / w;
      for (int dy = -1; dy <= 1; ++dy)
        for (int dx = -1; dx <= 1; ++dx) {
          if ((dx == 0 && dy == 0) || (!conn8 && dx && dy)) continue;
          const int nx = x + dx, ny = y + dy;
          if (nx < 0 || ny < 0 || nx >= w || ny >= h) continue;
          const int q = ny * w + nx;
          if (lab[q] || img[q] != img[s]) continue;
          lab[q] = count;
          stack.push_back(q);
        }
    }
  }
  return lab;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in(data, size);
  const int w = in.range(1, 48), h = in.range(1, 32), pad = in.range(0, 5);
  const bool conn8 = in.byte() & 1;
  const int norm = conn8 ? zelNormInf : zelNormL1;
  const int levels = in.range(1, 6);
  const int step = w + pad;
  std::vector<uint8_t> pixels(size_t(w) * h), image(size_t(step) * h + 16, 0xEE);
  in.fill(pixels.data(), pixels.size());
  for (auto& p : pixels) p = uint8_t(p % (levels + 1));
  auto load = [&] {
    for (int y = 0; y < h; ++y) std::memcpy(&image[size_t(y) * step], &pixels[size_t(y) * w], size_t(w));
  };
  int bytes = 0;
  if (zeliLabelMarkersGetBufferSize_8u_C1R({w, h}, &bytes) != zelStatusOk) abort();
  std::vector<uint8_t> buffer(size_t(bytes) + 1);

  // Labelling.
  load();
  int num = 0, count = 0;
  const int maxLabel = in.range(1, 254);
  if (zeliLabelMarkers_8u_C1IR(image.data(), step, {w, h}, 1, maxLabel, norm, &num, buffer.data() + 1) != 0)
    abort();
  const std::vector<int> want = floodLabels(pixels, w, h, conn8, count);
  if (num != count) abort();
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      if (image[size_t(y) * step + x] != (want[size_t(y) * w + x] < maxLabel ? want[size_t(y) * w + x] : maxLabel))
        abort();
  for (int y = 0; y < h; ++y)
    for (int x = w; x < step; ++x)
      if (image[size_t(y) * step + x] != 0xEE) abort();

  // Speckles: only speckle-valued pixels may appear where values changed.
  load();
  const int maxSize = in.range(0, 20);
  const uint8_t speckle = uint8_t(in.range(0, levels));
  if (zeliMarkSpecklesGetBufferSize({w, h}, zel8u, &bytes) != 0) abort();
  buffer.resize(size_t(bytes) + 1);
  if (zeliMarkSpeckles_8u_C1IR(image.data(), step, {w, h}, speckle, maxSize, uint8_t(in.range(0, 2)), 1,
                               buffer.data()) != 0)
    abort();
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      const uint8_t v = image[size_t(y) * step + x];
      if (v != pixels[size_t(y) * w + x] && v != speckle) abort();
    }

  // Watershed and gradient segmentation: seeds stay, labels come from seeds.
  std::vector<uint8_t> relief(pixels.size() * 3);
  in.fill(relief.data(), relief.size());
  std::vector<uint8_t> markers(pixels.size(), 0);
  bool seeded[256] = {};
  for (size_t i = 0; i < markers.size(); ++i)
    if (pixels[i] == 1 && (relief[i] & 7) == 0) markers[i] = uint8_t(1 + relief[i] % 250), seeded[markers[i]] = true;
  if (zeliSegmentWatershedGetBufferSize_8u_C1R({w, h}, &bytes) != 0) abort();
  buffer.resize(size_t(bytes) + 1);
  for (int form = 0; form < 3; ++form) {
    std::vector<uint8_t> m = markers;
    const int flag = in.byte() & 1;
    ZelStatus st;
    if (form == 0)
      st = zeliSegmentWatershed_8u_C1IR(relief.data(), w, m.data(), w, {w, h}, norm, flag, buffer.data() + 1);
    else if (form == 1)
      st = zeliSegmentGradient_8u_C1IR(relief.data(), w, m.data(), w, {w, h}, norm, flag, buffer.data() + 1);
    else
      st = zeliSegmentGradient_8u_C3IR(relief.data(), 3 * w, m.data(), w, {w, h}, norm, flag, buffer.data());
    if (st != 0) abort();
    for (size_t i = 0; i < m.size(); ++i) {
      if (markers[i] && m[i] != markers[i]) abort();
      if (m[i] && m[i] != 255 && !seeded[m[i]]) abort();
      if (!flag && m[i] == 255 && markers[i] != 255) abort();
    }
  }

  // Boundaries: every marked pixel had a different neighbour.
  load();
  if (zeliBoundSegments_8u_C1IR(image.data(), step, {w, h}, 200, norm) != 0) abort();
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      const uint8_t v = pixels[size_t(y) * w + x];
      bool differs = (x + 1 < w && pixels[size_t(y) * w + x + 1] != v) ||
                     (y + 1 < h && pixels[size_t(y + 1) * w + x] != v) ||
                     (conn8 && y + 1 < h &&
                      ((x > 0 && pixels[size_t(y + 1) * w + x - 1] != v) ||
                       (x + 1 < w && pixels[size_t(y + 1) * w + x + 1] != v)));
      if (image[size_t(y) * step + x] != (differs ? 200 : v)) abort();
    }
  return 0;
}
