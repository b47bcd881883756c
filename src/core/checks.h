// Argument checks in the library's fixed order: every pointer, then the ROI
// size, then each step against its row bytes in argument order, then the
// alignment of the steps of 16- and 32-bit images. A family calls one of these
// first and adds its own checks after a zero result.
#ifndef ZELCV_CORE_CHECKS_H
#define ZELCV_CORE_CHECKS_H

#include <stdint.h>

#include <initializer_list>

#include "zelcv.h"

namespace zelcv {

// One image argument as the checks see it.
struct ImageArg {
  const void* data;
  int step;
  int bitsPerPixel;  // element bits x channels; 1 for packed bit images
  int alignMask;     // element bytes - 1; 0 for one-byte images and masks

  int64_t rowBytes(int width) const { return (int64_t(width) * bitsPerPixel + 7) / 8; }
};

// An image of `channels` interleaved elements of type T per pixel.
template <typename T>
constexpr ImageArg image(const T* data, int step, int channels = 1) {
  return {data, step, int(sizeof(T)) * 8 * channels, int(sizeof(T)) - 1};
}

// A one-byte-per-pixel mask (compared with the width, never with an alignment).
constexpr ImageArg maskImage(const Zel8u* data, int step) { return {data, step, 8, 0}; }

// A packed one-bit image; its step is compared with (width + 7) / 8.
constexpr ImageArg bitImage(const Zel8u* data, int step) { return {data, step, 1, 0}; }

inline ZelStatus checkPointers(std::initializer_list<const void*> pointers) {
  for (const void* p : pointers)
    if (!p) return zelStatusNullPointer;
  return zelStatusOk;
}

inline ZelStatus checkSize(ZeliSize size) {
  return (size.width <= 0 || size.height <= 0) ? zelStatusBadSize : zelStatusOk;
}

// Steps and step alignment only (pointers and size already checked).
inline ZelStatus checkSteps(std::initializer_list<ImageArg> images, int width) {
  for (const ImageArg& im : images)
    if (im.step <= 0 || im.step < im.rowBytes(width)) return zelStatusBadStep;
  int misaligned = 0;
  for (const ImageArg& im : images) misaligned |= im.step & im.alignMask;
  return misaligned ? zelStatusMisalignedStep : zelStatusOk;
}

// The whole common sequence for an image operation. `pointers` holds the
// non-image pointers the operation uses (states, outputs, buffers).
inline ZelStatus checkImages(std::initializer_list<ImageArg> images, ZeliSize roi,
                             std::initializer_list<const void*> pointers = {}) {
  for (const ImageArg& im : images)
    if (!im.data) return zelStatusNullPointer;
  if (ZelStatus s = checkPointers(pointers)) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  return checkSteps(images, roi.width);
}

// A buffer or state size query: output pointer first, then the size.
inline ZelStatus checkSizeQuery(ZeliSize roi, const void* out) {
  if (!out) return zelStatusNullPointer;
  return checkSize(roi);
}

}  // namespace zelcv

#endif  // ZELCV_CORE_CHECKS_H
