// Tracking with everything from random bytes: level sizes and pixels (each
// level its own exactly sized block, so a read past it is reported), window
// size, levels, iterations, threshold, a state smaller or larger than the
// levels, and points anywhere, non-finite ones included.
#include <cmath>
#include <cstdint>
#include <cstring>
#include <vector>

#include "fuzz_input.h"
#include "zelcv.h"

namespace {

using zelfuzz::Input;

template <typename T>
struct Levels {
  std::vector<std::vector<T>> pixels;
  std::vector<Zel8u*> images;
  std::vector<ZeliSize> sizes;
  std::vector<Zel64f> scales;
  std::vector<int> steps;
  ZeliPyramid rec{};
  Levels(Input& in, int w, int h, int top) {
    for (int l = 0; l <= top; ++l) {
      pixels.emplace_back(size_t(w) * size_t(h));
      std::vector<uint8_t> bytes(pixels.back().size());
      in.fill(bytes.data(), bytes.size());
      for (size_t i = 0; i < bytes.size(); ++i) pixels.back()[i] = T(bytes[i]);
      images.push_back(reinterpret_cast<Zel8u*>(pixels.back().data()));
      sizes.push_back({w, h});
      scales.push_back(std::ldexp(1.0, -l));
      steps.push_back(w * int(sizeof(T)));
      w = (w + 1) / 2;
      h = (h + 1) / 2;
    }
    rec = {images.data(), sizes.data(), scales.data(), steps.data(), nullptr, top};
  }
};

template <typename T, typename Init, typename Track, typename Free>
void run(Input& in, Init init, Track track, Free release) {
  const int w = in.range(1, 48), h = in.range(1, 40), top = in.range(0, 3), win = in.range(1, 13);
  const int maxLev = in.range(0, top), maxIter = in.range(1, 20), n = in.range(1, 12);
  const float threshold = float(in.range(0, 100)) * 0.002f;
  const ZeliSize stateRoi = {in.range(1, 50), in.range(1, 42)};
  std::vector<ZeliPoint_32f> prev(static_cast<size_t>(n)), next(static_cast<size_t>(n));
  for (int i = 0; i < n; ++i) {
    const int kind = in.range(0, 15);
    prev[size_t(i)] = {float(in.range(-600, 600)) * 0.1f, float(in.range(-500, 500)) * 0.1f};
    next[size_t(i)] = {prev[size_t(i)].x + float(in.range(-40, 40)) * 0.1f,
                       prev[size_t(i)].y + float(in.range(-40, 40)) * 0.1f};
    if (kind == 0) prev[size_t(i)].x = NAN;
    if (kind == 1) next[size_t(i)].y = INFINITY;
    if (kind == 2) next[size_t(i)].x = 3e38f;
  }
  Levels<T> a(in, w, h, top), b(in, w, h, top);
  std::vector<Zel8s> status(static_cast<size_t>(n));
  std::vector<Zel32f> error(static_cast<size_t>(n));
  ZeliOptFlowPyrLKState* state = nullptr;
  if (init(&state, stateRoi, win, 0) != zelStatusOk) return;
  track(&a.rec, &b.rec, prev.data(), next.data(), status.data(), error.data(), n, win, maxLev, maxIter, threshold,
        state);
  release(state);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in(data, size);
  switch (in.range(0, 2)) {
    case 0:
      run<Zel8u>(in, zeliOpticalFlowPyrLKInitAlloc_8u_C1R, zeliOpticalFlowPyrLK_8u_C1R,
                 zeliOpticalFlowPyrLKFree_8u_C1R);
      break;
    case 1:
      run<Zel16u>(in, zeliOpticalFlowPyrLKInitAlloc_16u_C1R, zeliOpticalFlowPyrLK_16u_C1R,
                  zeliOpticalFlowPyrLKFree_16u_C1R);
      break;
    default:
      run<Zel32f>(in, zeliOpticalFlowPyrLKInitAlloc_32f_C1R, zeliOpticalFlowPyrLK_32f_C1R,
                  zeliOpticalFlowPyrLKFree_32f_C1R);
      break;
  }
  return 0;
}
