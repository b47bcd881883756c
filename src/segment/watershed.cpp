// Watershed and gradient segmentation: seeds flood the ROI through a queue of
// 256 levels, first in first out within a level, whose current level never
// goes down. The two differ only in a queued pixel's priority: its relief
// value, or its colour step from the pixel that queues it.
//
// The buffer holds one link per pixel (the level queues are singly linked
// lists threaded through it), one queued flag per pixel, and the heads and
// tails of the 256 levels.
#include <emmintrin.h>
#include <stdint.h>
#include <string.h>

#include "core/sizes.h"
#include "core/status.h"

namespace zelcv {
namespace {

constexpr int kLevels = 256;

SizeCalc floodBufferBytes(ZeliSize roi) {
  return SizeCalc(5) * SizeCalc(roi.width) * SizeCalc(roi.height) + SizeCalc(2 * kLevels * 4 + 64);
}

// The relief: the queued pixel's own value.
struct Relief {
  const uint8_t* src;
  int step;
  int priority(int64_t qy, int qx, int64_t, int) const { return src[qy * step + qx]; }
};

// Colour steps: the largest channel difference between two pixels.
template <int C>
struct Steps {
  const uint8_t* src;
  int step;
  int priority(int64_t qy, int qx, int64_t py, int px) const {
    const uint8_t* a = src + qy * step + qx * C;
    const uint8_t* b = src + py * step + px * C;
    int m = 0;
    for (int c = 0; c < C; ++c) {
      const int d = a[c] > b[c] ? a[c] - b[c] : b[c] - a[c];
      m = d > m ? d : m;
    }
    return m;
  }
};

// Row and column of a pixel index, by a multiplication with the reciprocal
// of the width and a correction of its rounding, instead of a division.
struct Locator {
  int w;
  double inverse;
  explicit Locator(int width) : w(width), inverse(1.0 / width) {}
  void operator()(int32_t idx, int& y, int& x) const {
    y = int(double(idx) * inverse);
    x = idx - y * w;
    if (x < 0) {
      --y;
      x += w;
    } else if (x >= w) {
      ++y;
      x -= w;
    }
  }
};

inline void prefetch(const void* p) { _mm_prefetch(static_cast<const char*>(p), _MM_HINT_T0); }

struct Neighbours {
  int count;
  int dx[8], dy[8];
};

// Left, up, right, down, then the diagonals.
constexpr Neighbours kConn8 = {8, {-1, 0, 1, 0, -1, 1, -1, 1}, {0, -1, 0, 1, -1, -1, 1, 1}};
constexpr Neighbours kConn4 = {4, {-1, 0, 1, 0, 0, 0, 0, 0}, {0, -1, 0, 1, 0, 0, 0, 0}};

template <typename M, typename P, bool kRelief>
void flood(const P& prio, M* markers, int mStep, int w, int h, bool conn8, bool lines, Zel8u* buffer) {
  const M boundary = M(~M(0));
  uint8_t* base = reinterpret_cast<uint8_t*>((reinterpret_cast<uintptr_t>(buffer) + 15) & ~uintptr_t(15));
  int32_t* head = reinterpret_cast<int32_t*>(base);
  int32_t* tail = head + kLevels;
  int32_t* next = tail + kLevels;
  const int64_t pixels = int64_t(w) * h;
  uint8_t* queued = reinterpret_cast<uint8_t*>(next + pixels);
  for (int i = 0; i < kLevels; ++i) head[i] = tail[i] = -1;
  memset(queued, 0, size_t(pixels));
  const Neighbours& nb = conn8 ? kConn8 : kConn4;
  auto mk = [&](int64_t y, int x) -> M& {
    return reinterpret_cast<M*>(reinterpret_cast<uint8_t*>(markers) + y * mStep)[x];
  };
  auto push = [&](int32_t idx, int level) {
    next[idx] = -1;
    if (tail[level] < 0)
      head[level] = idx;
    else
      next[tail[level]] = idx;
    tail[level] = idx;
    queued[idx] = 1;
  };
  auto labelled = [&](M v) { return v != 0 && v != boundary; };
  int lowest = kLevels;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      if (mk(y, x) != 0) continue;
      int best = kLevels;
      for (int k = 0; k < nb.count; ++k) {
        const int nx = x + nb.dx[k], ny = y + nb.dy[k];
        if (nx < 0 || ny < 0 || nx >= w || ny >= h || !labelled(mk(ny, nx))) continue;
        const int p = prio.priority(y, x, ny, nx);
        best = p < best ? p : best;
        if (kRelief) break;  // the relief does not depend on the neighbour
      }
      if (best == kLevels) continue;
      push(int32_t(int64_t(y) * w + x), best);
      lowest = best < lowest ? best : lowest;
    }
  const Locator locate(w);
  for (int level = lowest; level < kLevels;) {
    const int32_t idx = head[level];
    if (idx < 0) {
      ++level;
      continue;
    }
    const int32_t following = next[idx];
    head[level] = following;
    if (following < 0) {
      tail[level] = -1;
    } else {
      // The lists run in queueing order, scattered over the image: fetch
      // what the next pixel of this level reads while this one is worked.
      int fy, fx;
      locate(following, fy, fx);
      prefetch(next + following);
      prefetch(queued + following);
      prefetch(prio.src + int64_t(fy) * prio.step + fx);
      for (int dy = -1; dy <= 1; ++dy)
        if (fy + dy >= 0 && fy + dy < h) prefetch(&mk(fy + dy, fx));
    }
    int y, x;
    locate(idx, y, x);
    // Rows y - 1, y, y + 1 of the markers; away from the edges no neighbour
    // needs a bounds test.
    M* rows[3] = {y > 0 ? &mk(y - 1, 0) : nullptr, &mk(y, 0), y + 1 < h ? &mk(y + 1, 0) : nullptr};
    const bool inside = x > 0 && y > 0 && x + 1 < w && y + 1 < h;
    auto outside = [&](int k) {
      if (inside) return false;
      const int nx = x + nb.dx[k], ny = y + nb.dy[k];
      return nx < 0 || ny < 0 || nx >= w || ny >= h;
    };
    M label = 0;
    bool conflict = false;
    for (int k = 0; k < nb.count; ++k) {
      if (outside(k)) continue;
      const M v = rows[1 + nb.dy[k]][x + nb.dx[k]];
      if (!labelled(v)) continue;
      if (label == 0)
        label = v;
      else if (v != label)
        conflict = true;
    }
    if (lines && conflict) {
      rows[1][x] = boundary;
      continue;
    }
    rows[1][x] = label;
    for (int k = 0; k < nb.count; ++k) {
      if (outside(k)) continue;
      const int32_t nidx = idx + nb.dy[k] * w + nb.dx[k];
      if (queued[nidx] || rows[1 + nb.dy[k]][x + nb.dx[k]] != 0) continue;
      const int p = prio.priority(y + nb.dy[k], x + nb.dx[k], y, x);
      push(nidx, p > level ? p : level);
    }
  }
}

template <typename M, typename P, bool kRelief>
ZelStatus segment(const Zel8u* src, int srcStep, int channels, M* markers, int markersStep, ZeliSize roi, int norm,
                  int flag, Zel8u* buffer, const P& prio) {
  if (ZelStatus s = checkImages({image(src, srcStep, channels), image(markers, markersStep)}, roi, {buffer}))
    return s;
  if (floodBufferBytes(roi).value() > INT32_MAX) return zelStatusBadSize;
  if (norm != zelNormInf && norm != zelNormL1) return zelStatusBadArgument;
  if (flag != zelSegmentNoLines && flag != zelSegmentLines) return zelStatusBadArgument;
  flood<M, P, kRelief>(prio, markers, markersStep, roi.width, roi.height, norm == zelNormInf,
                       flag == zelSegmentLines, buffer);
  return zelStatusOk;
}

ZelStatus floodQuery(ZeliSize roi, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roi, bufferSize)) return s;
  const int64_t bytes = floodBufferBytes(roi).value();
  if (bytes > INT32_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliSegmentWatershedGetBufferSize_8u_C1R)(ZeliSize roiSize, int* bufferSize) {
  return floodQuery(roiSize, bufferSize);
}

ZELCV_ENTRY(zeliSegmentWatershedGetBufferSize_8u16u_C1R)(ZeliSize roiSize, int* bufferSize) {
  return floodQuery(roiSize, bufferSize);
}

ZELCV_SHARED_ENTRY(segmentGradientGetBufferSize)(ZeliSize roiSize, int* bufferSize) {
  return floodQuery(roiSize, bufferSize);
}

ZELCV_ENTRY(zeliSegmentWatershed_8u_C1IR)(const Zel8u* src, int srcStep, Zel8u* markers, int markersStep,
                                          ZeliSize roiSize, int norm, int flag, Zel8u* buffer) {
  return segment<Zel8u, Relief, true>(src, srcStep, 1, markers, markersStep, roiSize, norm, flag, buffer,
                                      Relief{src, srcStep});
}

ZELCV_ENTRY(zeliSegmentWatershed_8u16u_C1IR)(const Zel8u* src, int srcStep, Zel16u* markers, int markersStep,
                                             ZeliSize roiSize, int norm, int flag, Zel8u* buffer) {
  return segment<Zel16u, Relief, true>(src, srcStep, 1, markers, markersStep, roiSize, norm, flag, buffer,
                                       Relief{src, srcStep});
}

ZELCV_ENTRY(zeliSegmentGradient_8u_C1IR)(const Zel8u* src, int srcStep, Zel8u* markers, int markersStep,
                                         ZeliSize roiSize, int norm, int flag, Zel8u* buffer) {
  return segment<Zel8u, Steps<1>, false>(src, srcStep, 1, markers, markersStep, roiSize, norm, flag, buffer,
                                         Steps<1>{src, srcStep});
}

ZELCV_ENTRY(zeliSegmentGradient_8u_C3IR)(const Zel8u* src, int srcStep, Zel8u* markers, int markersStep,
                                         ZeliSize roiSize, int norm, int flag, Zel8u* buffer) {
  return segment<Zel8u, Steps<3>, false>(src, srcStep, 3, markers, markersStep, roiSize, norm, flag, buffer,
                                         Steps<3>{src, srcStep});
}
