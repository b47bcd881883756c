// Signed distance by fast sweeping: the first-order upwind solution of the
// eikonal equation |grad u| = 1, outside the 0 pixels positive and inside
// negative, measured from the boundary pixels (0 pixels with a non-zero
// 4-neighbour), which hold 0. Each sweep takes the upwind neighbours on the
// side it comes from; four sweep directions cover every characteristic
// direction, and rounds repeat until nothing changes, so the result is the
// fixed point of the upwind scheme whatever the shape.
#include <math.h>
#include <stdint.h>

#include <algorithm>

#include "core/alloc.h"
#include "core/status.h"

namespace zelcv {
namespace {

int64_t marchingBufferBytes(ZeliSize roi) {
  return (int64_t(roi.height) + 34) * (alignSize(roi.width, 32) | 5) + 40;
}

float* rowOf(Zel32f* base, int step, int y) {
  return reinterpret_cast<float*>(reinterpret_cast<uint8_t*>(base) + int64_t(step) * y);
}

// The new value of a pixel from its upwind neighbours t1 (horizontal) and t2
// (vertical); `inside` for a 0 source pixel.
inline float update(float u, float t1, float t2, bool inside) {
  if (!inside) {
    t1 = std::max(t1, 0.0f);
    t2 = std::max(t2, 0.0f);
    const float d = t1 - t2;
    const float c = fabsf(d) < 1.0f ? (t1 + t2 + sqrtf(2.0f - d * d)) * 0.5f : std::min(t1, t2) + 1.0f;
    return std::min(u, c);
  }
  if (t1 > 0.0f || t2 > 0.0f || (t1 == 0.0f && t2 == 0.0f)) return u;
  const float d = t1 - t2;
  const float c = fabsf(d) < 1.0f ? (t1 + t2 - sqrtf(2.0f - d * d)) * 0.5f : std::max(t1, t2) - 1.0f;
  return std::max(u, c);
}

// One sweep in the direction (sx, sy); true when a value changed.
bool sweep(Zel32f* dst, int dstStep, const uint8_t* inside, int w, int h, float r, int sx, int sy) {
  bool changed = false;
  for (int i = 0; i < h; ++i) {
    const int y = sy > 0 ? i : h - 1 - i;
    float* row = rowOf(dst, dstStep, y);
    const float* prev = (y - sy >= 0 && y - sy < h) ? rowOf(dst, dstStep, y - sy) : nullptr;
    const uint8_t* in = inside + int64_t(w) * y;
    for (int j = 0; j < w; ++j) {
      const int x = sx > 0 ? j : w - 1 - j;
      const float outer = in[x] ? -r : r;
      const float t1 = (x - sx >= 0 && x - sx < w) ? row[x - sx] : outer;
      const float t2 = prev ? prev[x] : outer;
      const float u = update(row[x], t1, t2, in[x] != 0);
      if (u != row[x]) {
        row[x] = u;
        changed = true;
      }
    }
  }
  return changed;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliFastMarchingGetBufferSize_8u32f_C1R)(ZeliSize roiSize, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  const int64_t bytes = marchingBufferBytes(roiSize);
  if (bytes > INT32_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliFastMarching_8u32f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                        ZeliSize roiSize, Zel32f radius, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep)}, roiSize, {buffer})) return s;
  // No buffer can serve a size that the query refuses.
  if (marchingBufferBytes(roiSize) > INT32_MAX) return zelStatusBadSize;
  if (!(radius >= 0.0f)) return zelStatusBadArgument;
  const int w = roiSize.width, h = roiSize.height;
  // The buffer holds one byte per pixel, rows packed: 1 for a 0 source pixel.
  uint8_t* inside = buffer;
  for (int y = 0; y < h; ++y) {
    const uint8_t* s = src + int64_t(srcStep) * y;
    for (int x = 0; x < w; ++x) inside[int64_t(w) * y + x] = s[x] == 0;
  }
  for (int y = 0; y < h; ++y) {
    const uint8_t* in = inside + int64_t(w) * y;
    float* out = rowOf(dst, dstStep, y);
    for (int x = 0; x < w; ++x) {
      if (!in[x]) {
        out[x] = radius;
        continue;
      }
      const bool boundary = (x > 0 && !in[x - 1]) || (x + 1 < w && !in[x + 1]) || (y > 0 && !in[x - w]) ||
                            (y + 1 < h && !in[x + w]);
      out[x] = boundary ? 0.0f : -radius;
    }
  }
  if (radius > 0.0f) {
    bool changed = true;
    while (changed) {
      changed = false;
      changed |= sweep(dst, dstStep, inside, w, h, radius, 1, 1);
      changed |= sweep(dst, dstStep, inside, w, h, radius, -1, 1);
      changed |= sweep(dst, dstStep, inside, w, h, radius, 1, -1);
      changed |= sweep(dst, dstStep, inside, w, h, radius, -1, -1);
    }
  }
  return zelStatusOk;
}
