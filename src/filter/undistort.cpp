// Entries of lens undistortion: the image operation and its buffer query, the
// map of source coordinates, and bilinear resampling through a map.
#include <limits.h>
#include <math.h>

#include <type_traits>

#include "core/alloc.h"
#include "core/sizes.h"
#include "core/status.h"
#include "filter/undistort_kernels.h"
#include "kernels/dispatch.h"

namespace zelcv {
namespace {

using undistort::CameraModel;
using undistort::Source;

// Two float coordinates per pixel of a row, and room to align them.
constexpr int kBufferAlign = 64;
// Resampling through a caller's map goes by tiles (a multiple of 8 wide).
constexpr int kBand = 16, kSpan = 256;

SizeCalc bufferBytes(int width) { return SizeCalc(width) * 8 + kBufferAlign; }

bool validCamera(float fx, float fy, float cx, float cy, float k1, float k2, float p1, float p2) {
  const float all[8] = {fx, fy, cx, cy, k1, k2, p1, p2};
  for (float v : all)
    if (!isfinite(v)) return false;
  return fx != 0.0f && fy != 0.0f;
}

// Whether 8u three-channel rows of this source take the AVX2 kernel: the
// processor has it and every neighbour lies at a 32-bit offset.
template <typename T, int C>
bool wideRows(const Source<T>& s) {
  if (!std::is_same<T, uint8_t>::value || C != 3) return false;
  if (int64_t(s.step) * s.height > INT_MAX) return false;
  return withChosenIsa<IsaLevel::Avx2>([](auto tag) {
    return !std::is_same<typename decltype(tag)::Isa, simd::Sse2>::value;
  });
}

// One row; groups of eight whose neighbourhoods are inside go to the AVX2
// kernel when `wide`, every other pixel to the baseline one.
template <typename T, int C>
void resampleRow(const Source<T>& s, bool wide, const float* mx, const float* my, T* dst, int width) {
  if constexpr (std::is_same<T, uint8_t>::value && C == 3) {
    if (wide) {
      int j = 0;
      for (;;) {
        j += avx2::remapRow8uC3(s.data, s.step, s.width - 2, s.height - 1, mx + j, my + j, dst + 3 * j, width - j);
        if (width - j < 8) break;
        // A group with a neighbourhood outside.
        undistort::remapQuad<T, C>(s, mx + j, my + j, dst + 3 * j);
        undistort::remapQuad<T, C>(s, mx + j + 4, my + j + 4, dst + 3 * j + 12);
        j += 8;
      }
      undistort::remapRow<T, C>(s, mx + j, my + j, dst + 3 * j, width - j);
      return;
    }
  }
  undistort::remapRow<T, C>(s, mx, my, dst, width);
}

template <typename T, int C>
ZelStatus runUndistort(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, float fx, float fy, float cx,
                       float cy, float k1, float k2, float p1, float p2, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep, C), image(dst, dstStep, C)}, roi, {buffer})) return s;
  if (static_cast<const void*>(src) == static_cast<const void*>(dst)) return zelStatusInPlaceNotSupported;
  if (!validCamera(fx, fy, cx, cy, k1, k2, p1, p2)) return zelStatusBadArgument;
  const CameraModel model = undistort::makeModel(fx, fy, cx, cy, k1, k2, p1, p2);
  float* u = reinterpret_cast<float*>(alignUp(buffer, kBufferAlign));
  float* v = u + roi.width;
  const Source<T> source{src, srcStep, roi.width, roi.height};
  const bool wide = wideRows<T, C>(source);
  for (int i = 0; i < roi.height; ++i) {
    undistort::mapRow(model, i, roi.width, u, v);
    T* out = reinterpret_cast<T*>(reinterpret_cast<char*>(dst) + ptrdiff_t(dstStep) * i);
    resampleRow<T, C>(source, wide, u, v, out, roi.width);
  }
  return zelStatusOk;
}

template <typename T, int C>
ZelStatus runRemap(const T* src, int srcStep, ZeliSize srcSize, const float* xMap, int xMapStep, const float* yMap,
                   int yMapStep, T* dst, int dstStep, ZeliSize roi) {
  if (ZelStatus s = checkPointers({src, xMap, yMap, dst})) return s;
  if (ZelStatus s = checkSize(srcSize)) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  // The source's step is measured against its own width, the others against
  // the destination's; every -14 comes before any -108.
  const ImageArg in = image(src, srcStep, C);
  if (srcStep <= 0 || srcStep < in.rowBytes(srcSize.width)) return zelStatusBadStep;
  if (ZelStatus s = checkSteps({image(xMap, xMapStep), image(yMap, yMapStep), image(dst, dstStep, C)}, roi.width))
    return s;
  if (srcStep & in.alignMask) return zelStatusMisalignedStep;
  if (static_cast<const void*>(src) == static_cast<const void*>(dst)) return zelStatusInPlaceNotSupported;
  const Source<T> source{src, srcStep, srcSize.width, srcSize.height};
  const bool wide = wideRows<T, C>(source);
  // Tiles of kBand rows and kSpan columns: the source pixels a tile reads
  // stay in the cache while it is written, wherever the map leads.
  for (int top = 0; top < roi.height; top += kBand) {
    const int bottom = roi.height - top < kBand ? roi.height : top + kBand;
    for (int left = 0; left < roi.width; left += kSpan) {
      const int count = roi.width - left < kSpan ? roi.width - left : kSpan;
      for (int i = top; i < bottom; ++i) {
        const float* mx =
            reinterpret_cast<const float*>(reinterpret_cast<const char*>(xMap) + ptrdiff_t(xMapStep) * i) + left;
        const float* my =
            reinterpret_cast<const float*>(reinterpret_cast<const char*>(yMap) + ptrdiff_t(yMapStep) * i) + left;
        T* out = reinterpret_cast<T*>(reinterpret_cast<char*>(dst) + ptrdiff_t(dstStep) * i) + ptrdiff_t(left) * C;
        resampleRow<T, C>(source, wide, mx, my, out, count);
      }
    }
  }
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

ZELCV_ENTRY(zeliUndistortGetSize)(ZeliSize roiSize, int* bufferSize) {
  if (ZelStatus s = zelcv::checkSizeQuery(roiSize, bufferSize)) return s;
  const zelcv::SizeCalc bytes = zelcv::bufferBytes(roiSize.width);
  if (bytes > zelcv::SizeCalc(INT_MAX)) return zelStatusBadSize;
  *bufferSize = int(bytes.value());
  return zelStatusOk;
}

#define ZELCV_UNDISTORT_ENTRY(suffix, T, ch)                                                                    \
  ZELCV_ENTRY(zeliUndistortRadial_##suffix)(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roiSize,  \
                                            Zel32f fx, Zel32f fy, Zel32f cx, Zel32f cy, Zel32f k1, Zel32f k2, \
                                            Zel32f p1, Zel32f p2, Zel8u* buffer) {                            \
    return zelcv::runUndistort<T, ch>(src, srcStep, dst, dstStep, roiSize, fx, fy, cx, cy, k1, k2, p1, p2,    \
                                      buffer);                                                              \
  }                                                                                                          \
  ZELCV_ENTRY(zeliRemapBilinear_##suffix)(const T* src, int srcStep, ZeliSize srcSize, const Zel32f* xMap,     \
                                          int xMapStep, const Zel32f* yMap, int yMapStep, T* dst, int dstStep,  \
                                          ZeliSize roiSize) {                                                  \
    return zelcv::runRemap<T, ch>(src, srcStep, srcSize, xMap, xMapStep, yMap, yMapStep, dst, dstStep,         \
                                  roiSize);                                                                  \
  }
ZELCV_UNDISTORT_ENTRY(8u_C1R, Zel8u, 1)
ZELCV_UNDISTORT_ENTRY(8u_C3R, Zel8u, 3)
ZELCV_UNDISTORT_ENTRY(32f_C1R, Zel32f, 1)
ZELCV_UNDISTORT_ENTRY(32f_C3R, Zel32f, 3)
#undef ZELCV_UNDISTORT_ENTRY

ZELCV_ENTRY(zeliCreateMapCameraUndistort_32f_C1R)(Zel32f* xMap, int xMapStep, Zel32f* yMap, int yMapStep,
                                                  ZeliSize roiSize, const Zel32f* camera,
                                                  const Zel32f* coefficients) {
  using namespace zelcv;
  if (ZelStatus s = checkImages({image(xMap, xMapStep), image(yMap, yMapStep)}, roiSize, {camera, coefficients}))
    return s;
  // The caller's arrays may sit at any address.
  auto at = [](const Zel32f* a, int i) { return simd::loadOne(a + i); };
  const float fx = at(camera, 0), fy = at(camera, 1), cx = at(camera, 2), cy = at(camera, 3);
  const float k1 = at(coefficients, 0), k2 = at(coefficients, 1), p1 = at(coefficients, 2), p2 = at(coefficients, 3);
  if (!validCamera(fx, fy, cx, cy, k1, k2, p1, p2)) return zelStatusBadArgument;
  const undistort::CameraModel model = undistort::makeModel(fx, fy, cx, cy, k1, k2, p1, p2);
  for (int i = 0; i < roiSize.height; ++i)
    undistort::mapRow(model, i, roiSize.width,
                      reinterpret_cast<float*>(reinterpret_cast<char*>(xMap) + ptrdiff_t(xMapStep) * i),
                      reinterpret_cast<float*>(reinterpret_cast<char*>(yMap) + ptrdiff_t(yMapStep) * i));
  return zelStatusOk;
}
