// 3x3 peaks of 32f and 32s images as a point list. Each row is first reduced
// to the columns above the threshold (a vector comparison), then only those
// are compared with their neighbours.
#include <emmintrin.h>

#include <climits>
#include <cmath>

#include "core/alloc.h"
#include "core/status.h"
#include "kernels/simd.h"

namespace zelcv {
namespace {

int64_t peaksBufferBytes(int width) { return 12 * (int64_t(width) + 2) + 64; }

// Columns x of row with row[x] > threshold, ascending; returns their count.
int candidates(const float* row, int n, float threshold, int* out) {
  int count = 0, x = 0;
  const __m128 t = _mm_set1_ps(threshold);
  for (; x + 4 <= n; x += 4) {
    int bits = _mm_movemask_ps(_mm_cmpgt_ps(_mm_loadu_ps(row + x), t));
    while (bits) {
      const int b = __builtin_ctz(unsigned(bits));
      out[count++] = x + b;
      bits &= bits - 1;
    }
  }
  for (; x < n; ++x)
    if (row[x] > threshold) out[count++] = x;
  return count;
}

int candidates(const int32_t* row, int n, int32_t threshold, int* out) {
  int count = 0, x = 0;
  const __m128i t = _mm_set1_epi32(threshold);
  for (; x + 4 <= n; x += 4) {
    int bits = _mm_movemask_ps(
        _mm_castsi128_ps(_mm_cmpgt_epi32(_mm_loadu_si128(reinterpret_cast<const __m128i*>(row + x)), t)));
    while (bits) {
      const int b = __builtin_ctz(unsigned(bits));
      out[count++] = x + b;
      bits &= bits - 1;
    }
  }
  for (; x < n; ++x)
    if (row[x] > threshold) out[count++] = x;
  return count;
}

template <typename T>
ZelStatus findPeaks(const T* src, int srcStep, ZeliSize roi, T threshold, int norm, int border, ZeliPoint* peaks,
                    int capacity, int* count, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep)}, roi, {peaks, count, buffer})) return s;
  if (capacity < 0 || border < 0 || threshold != threshold) return zelStatusBadArgument;
  if (norm != zelNormL1 && norm != zelNormInf) return zelStatusBadNormType;
  const int w = roi.width, h = roi.height;
  int* cols = reinterpret_cast<int*>(alignUp(buffer, 16));
  auto rowAt = [&](int y) {
    return reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(src) + ptrdiff_t(y) * srcStep);
  };
  int written = 0;
  ZelStatus status = zelStatusOk;
  const int64_t x0 = border, x1 = int64_t(w) - border;
  for (int64_t y = border; x1 > x0 && y < int64_t(h) - border && status == zelStatusOk; ++y) {
    const T* row = rowAt(int(y));
    const T* above = y > 0 ? rowAt(int(y) - 1) : nullptr;
    const T* below = y + 1 < h ? rowAt(int(y) + 1) : nullptr;
    const int n = candidates(row + x0, int(x1 - x0), threshold, cols);
    for (int i = 0; i < n; ++i) {
      const int x = int(x0) + cols[i];
      const T v = row[x];
      // A neighbour inside the ROI that is greater prevents the peak.
      bool peak = !(x > 0 && row[x - 1] > v) && !(x + 1 < w && row[x + 1] > v);
      if (above) peak = peak && !(above[x] > v);
      if (below) peak = peak && !(below[x] > v);
      if (peak && norm == zelNormInf) {
        if (above) peak = !(x > 0 && above[x - 1] > v) && !(x + 1 < w && above[x + 1] > v);
        if (peak && below) peak = !(x > 0 && below[x - 1] > v) && !(x + 1 < w && below[x + 1] > v);
      }
      if (!peak) continue;
      if (written == capacity) {
        status = zelStatusOutputFull;
        break;
      }
      simd::storeOne(peaks + written++, ZeliPoint{x, int(y)});  // any address
    }
  }
  *count = written;
  return status;
}

ZelStatus peaksQuery(int width, int* bufferSize) {
  if (!bufferSize) return zelStatusNullPointer;
  if (width <= 0) return zelStatusBadSize;
  const int64_t bytes = peaksBufferBytes(width);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliFindPeaks3x3GetBufferSize_32f_C1R)(int roiWidth, int* bufferSize) {
  return peaksQuery(roiWidth, bufferSize);
}
ZELCV_ENTRY(zeliFindPeaks3x3GetBufferSize_32s_C1R)(int roiWidth, int* bufferSize) {
  return peaksQuery(roiWidth, bufferSize);
}
ZELCV_ENTRY(zeliFindPeaks3x3_32f_C1R)(const Zel32f* src, int srcStep, ZeliSize roiSize, Zel32f threshold, int norm,
                                      int border, ZeliPoint* peaks, int capacity, int* count, Zel8u* buffer) {
  return findPeaks(src, srcStep, roiSize, threshold, norm, border, peaks, capacity, count, buffer);
}
ZELCV_ENTRY(zeliFindPeaks3x3_32s_C1R)(const Zel32s* src, int srcStep, ZeliSize roiSize, Zel32s threshold, int norm,
                                      int border, ZeliPoint* peaks, int capacity, int* count, Zel8u* buffer) {
  return findPeaks(src, srcStep, roiSize, threshold, norm, border, peaks, capacity, count, buffer);
}
