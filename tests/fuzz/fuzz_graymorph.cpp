// Reconstruction and grey-level morphology from random bytes: the bytes pick
// the type, the ROI, the connectivity and the images (NaN included for the
// floating types, where the result is not defined but the call must end and
// stay inside its memory). Integer reconstructions are compared with the
// plain definition, grey 8u dilation with a brute-force maximum.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "fuzz_input.h"
#include "zelcv.h"

namespace {

using zelfuzz::Input;

template <typename T>
std::vector<T> slowReconstruct(bool dilate, std::vector<T> m, const std::vector<T>& mask, int w, int h, bool eight) {
  for (size_t i = 0; i < m.size(); ++i) m[i] = dilate ? std::min(m[i], mask[i]) : std::max(m[i], mask[i]);
  for (bool changed = true; changed;) {
    std::vector<T> next(m);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        T best = m[size_t(y * w + x)];
        for (int dy = -1; dy <= 1; ++dy)
          for (int dx = -1; dx <= 1; ++dx) {
            const int nx = x + dx, ny = y + dy;
            if ((!eight && dx && dy) || nx < 0 || ny < 0 || nx >= w || ny >= h) continue;
            const T v = m[size_t(ny * w + nx)];
            best = dilate ? std::max(best, v) : std::min(best, v);
          }
        const T k = mask[size_t(y * w + x)];
        next[size_t(y * w + x)] = dilate ? std::min(best, k) : std::max(best, k);
      }
    changed = next != m;
    m.swap(next);
  }
  return m;
}

template <typename T, typename Op, typename Size>
void reconstruct(Input& in, Op dilateOp, Op erodeOp, Size bufferSize, bool compare) {
  const int w = in.range(1, 48), h = in.range(1, 32);
  const bool dilate = in.byte() & 1, eight = in.byte() & 1;
  const int pad = in.range(0, 3);
  const int step = (w + pad) * int(sizeof(T));
  std::vector<T> marker(size_t((w + pad) * h)), mask(marker.size());
  in.fill(reinterpret_cast<uint8_t*>(marker.data()), marker.size() * sizeof(T));
  in.fill(reinterpret_cast<uint8_t*>(mask.data()), mask.size() * sizeof(T));
  int size = 0;
  if (bufferSize(ZeliSize{w, h}, &size) != zelStatusOk) abort();
  std::vector<uint8_t> buffer(size_t(size) + 16);
  std::vector<T> result(marker);
  const ZelStatus s = (dilate ? dilateOp : erodeOp)(result.data(), step, mask.data(), step, ZeliSize{w, h},
                                                      eight ? zelNormInf : zelNormL1, buffer.data() + in.range(0, 15));
  if (s != zelStatusOk) abort();
  if (!compare) return;
  std::vector<T> m(size_t(w * h)), k(m.size());
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      m[size_t(y * w + x)] = marker[size_t(y * (w + pad) + x)];
      k[size_t(y * w + x)] = mask[size_t(y * (w + pad) + x)];
    }
  const std::vector<T> want = slowReconstruct(dilate, m, k, w, h, eight);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      if (result[size_t(y * (w + pad) + x)] != want[size_t(y * w + x)]) abort();
}

void grayDilate(Input& in) {
  const int w = in.range(1, 48), h = in.range(1, 16), mw = in.range(1, 7), mh = in.range(1, 7);
  const ZeliPoint anchor = {in.range(0, mw - 1), in.range(0, mh - 1)};
  std::vector<Zel32s> f(size_t(mw * mh));
  for (Zel32s& v : f) v = in.range(0, 600) - 300;
  std::vector<uint8_t> src(size_t(w * h)), dst(src.size());
  in.fill(src.data(), src.size());
  int size = 0;
  if (zeliMorphGrayGetSize_8u_C1R(w, {mw, mh}, &size) != zelStatusOk) abort();
  std::vector<uint8_t> state(size_t(size) + 31);
  auto* st = reinterpret_cast<ZeliMorphGrayState*>(state.data() + in.range(0, 31));
  if (zeliMorphGrayInit_8u_C1R(w, f.data(), {mw, mh}, anchor, st) != zelStatusOk) abort();
  if (zeliGrayDilateBorder_8u_C1R(src.data(), w, dst.data(), w, {w, h}, zelBorderReplicate, st) != zelStatusOk)
    abort();
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      int64_t best = INT64_MIN;
      for (int j = 0; j < mh; ++j)
        for (int i = 0; i < mw; ++i) {
          const int sx = std::min(std::max(x + i - anchor.x, 0), w - 1);
          const int sy = std::min(std::max(y + j - anchor.y, 0), h - 1);
          best = std::max<int64_t>(best, int64_t(src[size_t(sy * w + sx)]) + f[size_t(j * mw + i)]);
        }
      if (dst[size_t(y * w + x)] != uint8_t(std::min<int64_t>(255, std::max<int64_t>(0, best)))) abort();
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in(data, size);
  switch (in.range(0, 4)) {
    case 0:
      reconstruct<Zel8u>(in, zeliMorphReconstructDilate_8u_C1IR, zeliMorphReconstructErode_8u_C1IR,
                         zeliMorphReconstructGetBufferSize_8u_C1, true);
      break;
    case 1:
      reconstruct<Zel16u>(in, zeliMorphReconstructDilate_16u_C1IR, zeliMorphReconstructErode_16u_C1IR,
                          zeliMorphReconstructGetBufferSize_16u_C1, true);
      break;
    case 2:
      reconstruct<Zel32f>(in, zeliMorphReconstructDilate_32f_C1IR, zeliMorphReconstructErode_32f_C1IR,
                          zeliMorphReconstructGetBufferSize_32f_C1, false);
      break;
    case 3:
      reconstruct<Zel64f>(in, zeliMorphReconstructDilate_64f_C1IR, zeliMorphReconstructErode_64f_C1IR,
                          zeliMorphReconstructGetBufferSize_64f_C1, false);
      break;
    default:
      grayDilate(in);
      break;
  }
  return 0;
}
