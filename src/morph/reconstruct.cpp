// Morphological reconstruction by dilation and by erosion: a raster scan and
// an anti-raster scan carry values along the two scan orders, then a
// first-in first-out queue finishes the propagation that runs against both
// (paths that turn back). Each pixel enters the queue only when its value
// rose and it is not queued already, so the queue never holds more than
// W x H entries and the work is proportional to the pixels that change.
//
// Erosion is the same algorithm in the reversed order: "up" is the minimum
// and "down" the maximum. Both images are copied into frames one pixel wider
// on each side whose border holds the neutral value in marker and mask
// alike: it never raises a neighbour and never rises itself, so no loop
// tests for the edge.
#include <limits.h>
#include <string.h>

#include <limits>

#include "core/alloc.h"
#include "core/sizes.h"
#include "core/status.h"

namespace {

using namespace zelcv;

template <typename T, bool dilate>
struct Order {
  // The value that never propagates: the type's lowest for dilation.
  T neutral() const {
    if (std::numeric_limits<T>::has_infinity)
      return dilate ? -std::numeric_limits<T>::infinity() : std::numeric_limits<T>::infinity();
    return dilate ? std::numeric_limits<T>::lowest() : std::numeric_limits<T>::max();
  }
  // a strictly below b in the propagation order (false for NaN).
  bool below(T a, T b) const { return dilate ? a < b : b < a; }
  T up(T a, T b) const { return below(a, b) ? b : a; }
  T down(T a, T b) const { return below(b, a) ? b : a; }
};

int64_t bufferBytes(ZeliSize roi, int elementSize) {
  const SizeCalc framed = SizeCalc(int64_t(roi.width) + 2) * SizeCalc(int64_t(roi.height) + 2);
  return (framed * SizeCalc(2 * elementSize + 1) + SizeCalc(4) * SizeCalc(roi.width) * SizeCalc(roi.height) +
          SizeCalc(64))
      .value();
}

ZelStatus storeBufferSize(ZeliSize roi, int elementSize, int* out) {
  const int64_t size = bufferBytes(roi, elementSize);
  if (size > INT_MAX) return zelStatusBadSize;
  *out = int(size);
  return zelStatusOk;
}

template <typename T, bool dilate>
void reconstruct(T* srcDst, int srcDstStep, const T* mask, int maskStep, ZeliSize roi, bool eight,
                 uint8_t* buffer) {
  const Order<T, dilate> o;
  const int W = roi.width, H = roi.height;
  const int64_t pw = int64_t(W) + 2, framed = pw * (int64_t(H) + 2);
  T* J = reinterpret_cast<T*>(alignUp(buffer, 8));
  T* I = J + framed;
  uint8_t* queued = reinterpret_cast<uint8_t*>(I + framed);
  int32_t* queue = reinterpret_cast<int32_t*>(alignUp(queued + framed, 4));
  const T edge = o.neutral();

  // The frames: marker limited by the mask, the mask, a neutral border.
  for (int64_t i = 0; i < pw; ++i) J[i] = I[i] = J[framed - pw + i] = I[framed - pw + i] = edge;
  for (int y = 0; y < H; ++y) {
    const T* m = reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(srcDst) + int64_t(y) * srcDstStep);
    const T* k = reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(mask) + int64_t(y) * maskStep);
    T* j = J + (y + 1) * pw;
    T* i = I + (y + 1) * pw;
    j[0] = i[0] = j[W + 1] = i[W + 1] = edge;
    for (int x = 0; x < W; ++x) {
      i[x + 1] = k[x];
      j[x + 1] = o.down(m[x], k[x]);
    }
  }
  memset(queued, 0, size_t(framed));

  // Raster scan: each pixel takes the best of itself and its neighbours
  // already visited (left, and the row above), limited by the mask.
  for (int y = 1; y <= H; ++y) {
    T* j = J + y * pw;
    const T* a = j - pw;
    const T* i = I + y * pw;
    for (int x = 1; x <= W; ++x) {
      T v = o.up(j[x], o.up(j[x - 1], a[x]));
      if (eight) v = o.up(v, o.up(a[x - 1], a[x + 1]));
      j[x] = o.down(v, i[x]);
    }
  }
  // Anti-raster scan: the same from the other corner; a pixel that could
  // still raise one of its neighbours just visited goes into the queue.
  int64_t tail = 0;
  for (int y = H; y >= 1; --y) {
    T* j = J + y * pw;
    const T* b = j + pw;
    const T* i = I + y * pw;
    const T* ib = i + pw;
    for (int x = W; x >= 1; --x) {
      T v = o.up(j[x], o.up(j[x + 1], b[x]));
      if (eight) v = o.up(v, o.up(b[x - 1], b[x + 1]));
      v = o.down(v, i[x]);
      j[x] = v;
      bool raises = (o.below(j[x + 1], v) && o.below(j[x + 1], i[x + 1])) || (o.below(b[x], v) && o.below(b[x], ib[x]));
      if (eight)
        raises = raises || (o.below(b[x - 1], v) && o.below(b[x - 1], ib[x - 1])) ||
                 (o.below(b[x + 1], v) && o.below(b[x + 1], ib[x + 1]));
      if (raises) {
        const int64_t p = y * pw + x;
        queued[p] = 1;
        queue[tail++] = int32_t(p);
      }
    }
  }
  // The queue, a ring of W x H slots.
  const int64_t capacity = int64_t(W) * H;
  const int32_t p4[4] = {-1, 1, int32_t(-pw), int32_t(pw)};
  const int32_t p8[8] = {-1, 1, int32_t(-pw), int32_t(pw), int32_t(-pw - 1), int32_t(-pw + 1), int32_t(pw - 1),
                         int32_t(pw + 1)};
  const int32_t* offsets = eight ? p8 : p4;
  const int count = eight ? 8 : 4;
  int64_t head = 0, size = tail;
  if (tail == capacity) tail = 0;
  while (size > 0) {
    const int32_t p = queue[head];
    head = head + 1 == capacity ? 0 : head + 1;
    --size;
    queued[p] = 0;
    const T v = J[p];
    for (int n = 0; n < count; ++n) {
      const int32_t q = p + offsets[n];
      if (o.below(J[q], v) && o.below(J[q], I[q])) {
        J[q] = o.down(v, I[q]);
        if (!queued[q]) {
          queued[q] = 1;
          queue[tail] = q;
          tail = tail + 1 == capacity ? 0 : tail + 1;
          ++size;
        }
      }
    }
  }
  for (int y = 0; y < H; ++y) {
    T* m = reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(srcDst) + int64_t(y) * srcDstStep);
    memcpy(m, J + (y + 1) * pw + 1, size_t(W) * sizeof(T));
  }
}

template <typename T>
ZelStatus run(bool dilate, T* srcDst, int srcDstStep, const T* mask, int maskStep, ZeliSize roi, int norm,
              Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(srcDst, srcDstStep), image(mask, maskStep)}, roi, {buffer})) return s;
  if (norm != zelNormInf && norm != zelNormL1) return zelStatusBadNormType;
  if (bufferBytes(roi, int(sizeof(T))) > INT_MAX) return zelStatusBadSize;
  if (dilate)
    reconstruct<T, true>(srcDst, srcDstStep, mask, maskStep, roi, norm == zelNormInf, buffer);
  else
    reconstruct<T, false>(srcDst, srcDstStep, mask, maskStep, roi, norm == zelNormInf, buffer);
  return zelStatusOk;
}

int elementSizeOf(ZelDataType type) {
  switch (type) {
    case zel8u: return 1;
    case zel16u: return 2;
    case zel32f: return 4;
    case zel64f: return 8;
    default: return 0;
  }
}

}  // namespace

ZELCV_ENTRY(zeliMorphReconstructGetBufferSize)(ZeliSize roiSize, ZelDataType dataType, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  const int e = elementSizeOf(dataType);
  if (!e) return zelStatusBadDataType;
  return storeBufferSize(roiSize, e, bufferSize);
}

#define ZELCV_RECONSTRUCT(t, T)                                                                                 \
  ZELCV_ENTRY(zeliMorphReconstructGetBufferSize_##t##_C1)(ZeliSize roiSize, int* bufferSize) {                 \
    if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;                                            \
    return storeBufferSize(roiSize, int(sizeof(T)), bufferSize);                                                \
  }                                                                                                             \
  ZELCV_ENTRY(zeliMorphReconstructDilate_##t##_C1IR)(T * srcDst, int srcDstStep, const T* mask, int maskStep,  \
                                                     ZeliSize roiSize, int norm, Zel8u* buffer) {               \
    return run<T>(true, srcDst, srcDstStep, mask, maskStep, roiSize, norm, buffer);                             \
  }                                                                                                             \
  ZELCV_ENTRY(zeliMorphReconstructErode_##t##_C1IR)(T * srcDst, int srcDstStep, const T* mask, int maskStep,   \
                                                    ZeliSize roiSize, int norm, Zel8u* buffer) {                \
    return run<T>(false, srcDst, srcDstStep, mask, maskStep, roiSize, norm, buffer);                            \
  }
ZELCV_RECONSTRUCT(8u, Zel8u)
ZELCV_RECONSTRUCT(16u, Zel16u)
ZELCV_RECONSTRUCT(32f, Zel32f)
ZELCV_RECONSTRUCT(64f, Zel64f)
