// Pyramids from random sizes, rates and kernels. Images and work buffers are
// blocks of exactly the size they need (the source with a padded step), so
// AddressSanitizer sees any access past them. Checked: the 5x5 Gaussian down
// and up steps of 8u against a plain evaluation of their formulas; layer
// states walked down (and up) their chain of sizes; pyramid records against
// the down-size query and the product of the scales.
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <vector>

#include "fuzz_input.h"
#include "zelcv.h"

namespace {

using zelfuzz::Input;

// Reflection about the edge pixel without repeating it, as often as needed.
int reflect(int i, int n) {
  if (n == 1) return 0;
  while (i < 0 || i >= n) i = i < 0 ? -i : 2 * (n - 1) - i;
  return i;
}

std::vector<uint8_t> gaussDown(const std::vector<uint8_t>& s, int w, int h, int step) {
  const int dw = (w + 1) / 2, dh = (h + 1) / 2;
  auto rowSum = [&](int y, int x) {
    auto p = [&](int dx) { return int(s[size_t(y) * size_t(step) + size_t(reflect(x + dx, w))]); };
    return (p(-2) + p(2)) + (p(-1) + p(1)) * 4 + p(0) * 6;
  };
  std::vector<uint8_t> d(size_t(dw) * size_t(dh));
  for (int j = 0; j < dh; ++j)
    for (int i = 0; i < dw; ++i) {
      int sum;
      if (h <= 2) {
        sum = (rowSum(0, 2 * i) + rowSum(h - 1, 2 * i)) * 8;
      } else {
        auto r = [&](int dy) { return rowSum(reflect(2 * j + dy, h), 2 * i); };
        sum = (r(-2) + r(2)) + (r(-1) + r(1)) * 4 + r(0) * 6;
      }
      d[size_t(j) * size_t(dw) + size_t(i)] = uint8_t((sum + 128) >> 8);
    }
  return d;
}

// Along one axis, in eighths: index 2k from x[k-1], x[k], x[k+1]; 2k + 1 from x[k], x[k+1].
int upTap(int index, int n, const std::vector<int>& x) {
  const int k = index / 2;
  auto at = [&](int i) { return i < 0 ? x[size_t(n == 1 ? 0 : 1)] : x[size_t(i >= n ? n - 1 : i)]; };
  return index % 2 == 0 ? (at(k - 1) + at(k + 1)) + at(k) * 6 : (at(k) + at(k + 1)) * 4;
}

std::vector<uint8_t> gaussUp(const std::vector<uint8_t>& s, int w, int h, int step) {
  std::vector<std::vector<int>> rows(size_t(h), std::vector<int>(size_t(2 * w)));
  for (int y = 0; y < h; ++y) {
    std::vector<int> x(s.begin() + std::ptrdiff_t(y) * step, s.begin() + std::ptrdiff_t(y) * step + w);
    for (int i = 0; i < 2 * w; ++i) rows[size_t(y)][size_t(i)] = upTap(i, w, x);
  }
  std::vector<uint8_t> d(size_t(4) * size_t(w) * size_t(h));
  std::vector<int> column(static_cast<size_t>(h));
  for (int i = 0; i < 2 * w; ++i) {
    for (int y = 0; y < h; ++y) column[size_t(y)] = rows[size_t(y)][size_t(i)];
    for (int j = 0; j < 2 * h; ++j) d[size_t(j) * size_t(2 * w) + size_t(i)] = uint8_t((upTap(j, h, column) + 32) >> 6);
  }
  return d;
}

void gauss(Input& in, bool down) {
  const int w = in.range(1, 40), h = in.range(1, 24), step = w + in.range(0, 5);
  std::vector<uint8_t> src(size_t(step) * size_t(h));
  in.fill(src.data(), src.size());
  int bytes = 0;
  const ZelStatus q = down ? zeliPyrDownGetBufSize_Gauss5x5(w, 1, 1, &bytes) : zeliPyrUpGetBufSize_Gauss5x5(w, 1, 1, &bytes);
  if (q != zelStatusOk) abort();
  std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
  const int dw = down ? (w + 1) / 2 : 2 * w, dh = down ? (h + 1) / 2 : 2 * h;
  std::vector<uint8_t> dst(size_t(dw) * size_t(dh));
  const ZelStatus st = down ? zeliPyrDown_Gauss5x5_8u_C1R(src.data(), step, dst.data(), dw, {w, h}, buffer.data())
                            : zeliPyrUp_Gauss5x5_8u_C1R(src.data(), step, dst.data(), dw, {w, h}, buffer.data());
  if (st != zelStatusOk || dst != (down ? gaussDown(src, w, h, step) : gaussUp(src, w, h, step))) abort();
}

void layers(Input& in) {
  const ZeliSize base{in.range(1, 64), in.range(1, 48)};
  const Zel32f rate = 1.0f + Zel32f(in.range(1, 90)) / 10.0f;
  const int kerSize = 3 + 2 * in.range(0, 3);
  std::vector<Zel16s> kernel(static_cast<size_t>(kerSize));
  for (Zel16s& k : kernel) k = Zel16s(in.range(-4, 16));
  const bool down = in.byte() & 1;
  ZeliPyramidLayerState* state = nullptr;
  const ZelStatus made =
      down ? zeliPyramidLayerDownInitAlloc_8u_C1R(&state, base, rate, kernel.data(), kerSize, 2)
           : zeliPyramidLayerUpInitAlloc_8u_C1R(&state, base, rate, kernel.data(), kerSize, 2);
  if (made != zelStatusOk) abort();
  // The state's chain of down sizes; a down step's destination is the size
  // after the first entry with the source's height (widths not compared).
  std::vector<ZeliSize> chain{base};
  while (chain.back().width >= 2 || chain.back().height >= 2) {
    ZeliSize next{};
    if (zeliGetPyramidDownROI(chain.back(), &next, rate) != zelStatusOk) abort();
    chain.push_back(next);
  }
  ZeliSize size = base;
  for (int level = 0; level < 4; ++level) {
    ZeliSize next{}, nextMax{};
    if (down) {
      if (size.width < 2 && size.height < 2) break;
      size_t i = 0;
      while (chain[i].height != size.height) ++i;
      next = chain[i + 1];
    } else {
      if (zeliGetPyramidUpROI(size, &next, &nextMax, rate) != zelStatusOk) abort();
      if (next.width > base.width) break;  // the state's work rows cover sources up to the base width
    }
    const int step = size.width + in.range(0, 3);
    std::vector<Zel8u> src(size_t(step) * size_t(size.height));
    in.fill(src.data(), src.size());
    std::vector<Zel8u> dst(size_t(next.width) * size_t(next.height));
    const ZelStatus st = down ? zeliPyramidLayerDown_8u_C1R(src.data(), step, size, dst.data(), next.width, next, state)
                              : zeliPyramidLayerUp_8u_C1R(src.data(), step, size, dst.data(), next.width, next, state);
    if (st != zelStatusOk) abort();
    size = next;
  }
  if ((down ? zeliPyramidLayerDownFree_8u_C1R(state) : zeliPyramidLayerUpFree_8u_C1R(state)) != zelStatusOk) abort();
}

void record(Input& in) {
  const ZeliSize base{in.range(1, 5000), in.range(1, 5000)};
  const Zel32f rate = 1.0f + Zel32f(in.range(1, 900)) / 100.0f;
  const int level = in.range(1, 40);
  ZeliPyramid* pyramid = nullptr;
  if (zeliPyramidInitAlloc(&pyramid, level, base, rate) != zelStatusOk) abort();
  if (pyramid->level < 0 || pyramid->level > level) abort();
  double scale = 1.0;
  for (int i = 0; i <= pyramid->level; ++i) {
    if (pyramid->images[i] != nullptr || pyramid->steps[i] != 0 || pyramid->scales[i] != scale) abort();
    if (i > 0) {
      ZeliSize want{};
      if (zeliGetPyramidDownROI(pyramid->roiSizes[i - 1], &want, rate) != zelStatusOk) abort();
      if (pyramid->roiSizes[i].width != want.width || pyramid->roiSizes[i].height != want.height) abort();
    }
    scale *= 1.0 / double(rate);
  }
  if (zeliPyramidFree(pyramid) != zelStatusOk) abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in(data, size);
  switch (in.range(0, 3)) {
    case 0: gauss(in, true); break;
    case 1: gauss(in, false); break;
    case 2: layers(in); break;
    default: record(in); break;
  }
  return 0;
}
