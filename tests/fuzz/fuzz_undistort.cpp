// Lens undistortion and bilinear resampling with maps from raw bytes (any
// float: NaN, infinities, huge and tiny values, positions on every edge) and
// cameras from small decisions. The source is one exactly sized block, so a
// read past its last pixel is a heap overflow that AddressSanitizer reports;
// undistortion must equal its map followed by resampling.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "fuzz_input.h"
#include "zelcv.h"

namespace {

using zelfuzz::Input;

template <typename T, typename Remap, typename Undistort>
void run(Input& in, int channels, Remap remap, Undistort undistort) {
  const int sw = in.range(1, 40), sh = in.range(1, 8), dw = in.range(1, 40), dh = in.range(1, 6);
  const size_t srcRow = size_t(sw) * size_t(channels);
  std::vector<T> src(srcRow * size_t(sh));
  for (T& v : src) v = T(in.byte());
  std::vector<Zel32f> xMap(size_t(dw) * size_t(dh)), yMap(xMap.size());
  // Half the positions are raw bit patterns, half small quarters around the source.
  for (size_t i = 0; i < xMap.size(); ++i) {
    if (in.byte() & 1) {
      uint8_t raw[8];
      for (uint8_t& b : raw) b = in.byte();
      std::memcpy(&xMap[i], raw, 4);
      std::memcpy(&yMap[i], raw + 4, 4);
    } else {
      xMap[i] = float(in.range(-12, 4 * sw + 12)) / 4.0f - 1.0f;
      yMap[i] = float(in.range(-12, 4 * sh + 12)) / 4.0f - 1.0f;
    }
  }
  std::vector<T> dst(size_t(dw) * size_t(dh) * size_t(channels));
  const int ts = int(sizeof(T));
  remap(src.data(), int(srcRow) * ts, ZeliSize{sw, sh}, xMap.data(), dw * 4, yMap.data(), dw * 4, dst.data(),
        dw * channels * ts, ZeliSize{dw, dh});

  // Undistortion of the source with a camera from the input, against the map
  // member plus resampling.
  const float fx = float(in.range(-400, 400)) / 8.0f, fy = float(in.range(-400, 400)) / 8.0f;
  const float cx = float(in.range(-80, 80)) / 2.0f, cy = float(in.range(-40, 40)) / 2.0f;
  const float k[4] = {float(in.range(-100, 100)) / 50.0f, float(in.range(-100, 100)) / 50.0f,
                      float(in.range(-100, 100)) / 500.0f, float(in.range(-100, 100)) / 500.0f};
  int bytes = 0;
  if (zeliUndistortGetSize(ZeliSize{sw, sh}, &bytes) != zelStatusOk) abort();
  std::vector<Zel8u> buffer(size_t(bytes) + 16);
  std::vector<T> out(src.size()), viaMap(src.size());
  const ZelStatus s = undistort(src.data(), int(srcRow) * ts, out.data(), int(srcRow) * ts, ZeliSize{sw, sh}, fx, fy,
                                cx, cy, k[0], k[1], k[2], k[3], buffer.data() + in.range(0, 15));
  if (s != zelStatusOk) {
    if (fx != 0.0f && fy != 0.0f) abort();  // every other parameter here is finite
    return;
  }
  std::vector<Zel32f> mx(size_t(sw) * size_t(sh)), my(mx.size());
  const Zel32f camera[4] = {fx, fy, cx, cy};
  if (zeliCreateMapCameraUndistort_32f_C1R(mx.data(), sw * 4, my.data(), sw * 4, ZeliSize{sw, sh}, camera, k) !=
      zelStatusOk)
    abort();
  if (remap(src.data(), int(srcRow) * ts, ZeliSize{sw, sh}, mx.data(), sw * 4, my.data(), sw * 4, viaMap.data(),
            int(srcRow) * ts, ZeliSize{sw, sh}) != zelStatusOk)
    abort();
  if (std::memcmp(out.data(), viaMap.data(), out.size() * sizeof(T)) != 0) abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in(data, size);
  switch (in.range(0, 3)) {
    case 0:
      run<Zel8u>(in, 1, zeliRemapBilinear_8u_C1R, zeliUndistortRadial_8u_C1R);
      break;
    case 1:
      run<Zel8u>(in, 3, zeliRemapBilinear_8u_C3R, zeliUndistortRadial_8u_C3R);
      break;
    case 2:
      run<Zel32f>(in, 1, zeliRemapBilinear_32f_C1R, zeliUndistortRadial_32f_C1R);
      break;
    default:
      run<Zel32f>(in, 3, zeliRemapBilinear_32f_C3R, zeliUndistortRadial_32f_C3R);
      break;
  }
  return 0;
}
