// AbsDiff and AbsDiffC: absolute differences of two images or of an image and
// a constant, for 8u (one and three channels), 16u and 32f.
#include <limits>

#include "arith/store_mode.h"
#include "core/status.h"
#include "kernels/absdiff.h"
#include "kernels/dispatch.h"

namespace zelcv {
namespace {

constexpr int kSinglePath = 0;  // no cache query, ordinary stores

StoreMode storeMode(int bytesPerPixel, ZeliSize roi) {
  return bytesPerPixel ? chooseStoreMode(bytesPerPixel, roi) : StoreMode::Ordinary;
}

template <typename T>
void run(StoreMode mode, Plane<const T> src1, Plane<const T> src2, T c, Plane<T> dst, int width, int height) {
  withChosenIsa<IsaLevel::Avx512>([&](auto isa) {
    absdiff::run<T, typename decltype(isa)::Isa>(mode, src1, src2, c, dst, width, height);
  });
}

// |src1 - src2| over `channels` interleaved channels, run as one channel over
// channels x width elements (the checks see the same row bytes).
template <typename T>
ZelStatus difference(const T* src1, int src1Step, const T* src2, int src2Step, T* dst, int dstStep, ZeliSize roi,
                     int channels, int bytesPerPixel) {
  if (ZelStatus s = checkImages(
          {image(src1, src1Step, channels), image(src2, src2Step, channels), image(dst, dstStep, channels)}, roi))
    return s;
  run<T>(storeMode(bytesPerPixel, roi), {src1, src1Step}, {src2, src2Step}, T(), {dst, dstStep},
                  roi.width * channels, roi.height);
  return zelStatusOk;
}

// |src - c|, with c already in the element type.
template <typename T>
ZelStatus differenceFromConstant(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, T c,
                                 int bytesPerPixel) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep)}, roi)) return s;
  run<T>(storeMode(bytesPerPixel, roi), {src, srcStep}, {nullptr, 0}, c, {dst, dstStep}, roi.width,
                  roi.height);
  return zelStatusOk;
}

// An integer constant clamped to the range of T: the difference is then exact.
template <typename T>
T clampTo(int value) {
  if (value < 0) return 0;
  return value > int(std::numeric_limits<T>::max()) ? std::numeric_limits<T>::max() : T(value);
}

}  // namespace
}  // namespace zelcv

using zelcv::clampTo;
using zelcv::difference;
using zelcv::differenceFromConstant;
using zelcv::kSinglePath;

ZELCV_ENTRY(zeliAbsDiff_8u_C1R)(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, Zel8u* dst,
                                int dstStep, ZeliSize roiSize) {
  return difference(src1, src1Step, src2, src2Step, dst, dstStep, roiSize, 1, kSinglePath);
}

ZELCV_ENTRY(zeliAbsDiff_8u_C3R)(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, Zel8u* dst,
                                int dstStep, ZeliSize roiSize) {
  return difference(src1, src1Step, src2, src2Step, dst, dstStep, roiSize, 3, kSinglePath);
}

ZELCV_ENTRY(zeliAbsDiff_16u_C1R)(const Zel16u* src1, int src1Step, const Zel16u* src2, int src2Step, Zel16u* dst,
                                 int dstStep, ZeliSize roiSize) {
  return difference(src1, src1Step, src2, src2Step, dst, dstStep, roiSize, 1, 6);
}

ZELCV_ENTRY(zeliAbsDiff_32f_C1R)(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step, Zel32f* dst,
                                 int dstStep, ZeliSize roiSize) {
  return difference(src1, src1Step, src2, src2Step, dst, dstStep, roiSize, 1, 12);
}

ZELCV_ENTRY(zeliAbsDiffC_8u_C1R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                 int value) {
  return differenceFromConstant(src, srcStep, dst, dstStep, roiSize, clampTo<Zel8u>(value), kSinglePath);
}

// Counts 6 bytes per pixel like AbsDiff_16u although it touches 4: a
// deliberate part of the tuning.
ZELCV_ENTRY(zeliAbsDiffC_16u_C1R)(const Zel16u* src, int srcStep, Zel16u* dst, int dstStep, ZeliSize roiSize,
                                  int value) {
  return differenceFromConstant(src, srcStep, dst, dstStep, roiSize, clampTo<Zel16u>(value), 6);
}

ZELCV_ENTRY(zeliAbsDiffC_32f_C1R)(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize,
                                  Zel32f value) {
  return differenceFromConstant(src, srcStep, dst, dstStep, roiSize, value, 8);
}
