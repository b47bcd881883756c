// Marker labelling: regions of equal non-zero value, numbered in the raster
// order of their first pixel. Runs of equal value are found with vector
// compares, linked to the touching runs of equal value in the row above,
// resolved in one forward pass and painted back as whole runs.
#include <emmintrin.h>
#include <stdint.h>
#include <string.h>

#include "core/status.h"
#include "segment/label_markers.h"
#include "segment/label_runs.h"

namespace zelcv {
namespace runs {
namespace {

template <typename T>
const T* rowAt(const T* base, int step, int y) {
  return reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(base) + int64_t(step) * y);
}
template <typename T>
T* rowAt(T* base, int step, int y) {
  return reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(base) + int64_t(step) * y);
}

}  // namespace

template <typename T, bool kVector>
int32_t findEqualRuns(const T* src, int srcStep, int w, int h, bool conn8, const Layout& l) {
  Run* r = l.runs;
  int32_t n = 0;
  const int ext = conn8 ? 1 : 0;
  for (int y = 0; y < h; ++y) {
    const T* s = rowAt(src, srcStep, y);
    const T* above = y > 0 ? rowAt(src, srcStep, y - 1) : nullptr;
    l.rowStart[y] = n;
    const int32_t prevEnd = n;
    int32_t j = y > 0 ? l.rowStart[y - 1] : n;
    int x = Scan<T, kVector>::firstOther(s, 0, w, T(0));
    while (x < w) {
      const T v = s[x];
      const int e = Scan<T, kVector>::firstOther(s, x + 1, w, v) - 1;
      r[n] = {x, e, n};
      if (above) {
        while (j < prevEnd && r[j].x1 < x - ext) ++j;
        for (int32_t k = j; k < prevEnd && r[k].x0 <= e + ext; ++k)
          if (above[r[k].x0] == v) unite(r, n, k);
      }
      ++n;
      x = e + 1 < w && s[e + 1] != 0 ? e + 1 : Scan<T, kVector>::firstOther(s, e + 1, w, T(0));
    }
  }
  l.rowStart[h] = n;
  return n;
}

template int32_t findEqualRuns<uint8_t, false>(const uint8_t*, int, int, int, bool, const Layout&);
template int32_t findEqualRuns<uint8_t, true>(const uint8_t*, int, int, int, bool, const Layout&);
template int32_t findEqualRuns<uint16_t, false>(const uint16_t*, int, int, int, bool, const Layout&);
template int32_t findEqualRuns<uint16_t, true>(const uint16_t*, int, int, int, bool, const Layout&);

int64_t resolveLabels(Run* r, int32_t n, int64_t minLabel, int64_t maxLabel) {
  int64_t regions = 0;
  for (int32_t i = 0; i < n; ++i) {
    const int32_t p = r[i].parent;
    if (p == i) {
      const int64_t label = minLabel + regions <= maxLabel ? minLabel + regions : maxLabel;
      ++regions;
      r[i].parent = int32_t(-label - 1);
    } else {
      r[i].parent = r[p].parent;  // p < i holds its region's label already
    }
  }
  return regions;
}

}  // namespace runs

namespace {

using runs::Layout;
using runs::Run;

// n values v from p on, sixteen bytes per store (rows of 16u and 32s labels
// may sit at any address).
template <typename D>
void fillValues(D* p, int n, D v) {
  if constexpr (sizeof(D) == 1) {
    memset(p, int(v), size_t(n));
  } else {
    constexpr int kPer = 16 / sizeof(D);
    const __m128i vv = sizeof(D) == 2 ? _mm_set1_epi16(short(v)) : _mm_set1_epi32(int(v));
    int i = 0;
    for (; i + kPer <= n; i += kPer) _mm_storeu_si128(reinterpret_cast<__m128i*>(p + i), vv);
    for (; i < n; ++i) p[i] = v;
  }
}

template <typename D>
void paintRuns(const Layout& l, D* dst, int dstStep, int w, int h, bool clearGaps) {
  for (int y = 0; y < h; ++y) {
    D* d = reinterpret_cast<D*>(reinterpret_cast<uint8_t*>(dst) + int64_t(dstStep) * y);
    int x = 0;
    for (int32_t i = l.rowStart[y]; i < l.rowStart[y + 1]; ++i) {
      // Locals: the stores below could alias the run list for all the
      // compiler knows.
      const int x0 = l.runs[i].x0, x1 = l.runs[i].x1;
      const D label = D(-(int64_t(l.runs[i].parent) + 1));
      if (clearGaps) fillValues<D>(d + x, x0 - x, D(0));
      fillValues<D>(d + x0, x1 - x0 + 1, label);
      x = x1 + 1;
    }
    if (clearGaps) fillValues<D>(d + x, w - x, D(0));
  }
}

ZelStatus checkLabelArgs(ZeliSize roi, int minLabel, int maxLabel, int norm, int64_t limit) {
  if (runs::bufferBytes(roi.width, roi.height).value() > INT32_MAX) return zelStatusBadSize;
  if (norm != zelNormInf && norm != zelNormL1) return zelStatusBadArgument;
  if (minLabel < 1 || maxLabel > limit) return zelStatusBadArgument;
  if (maxLabel < minLabel) return zelStatusBadRange;
  return zelStatusOk;
}

template <typename S, typename D>
void label(const S* src, int srcStep, D* dst, int dstStep, ZeliSize roi, int minLabel, int maxLabel, int norm,
           int* markersNum, Zel8u* buffer, bool clearGaps) {
  const Layout l = runs::place(buffer, roi.height);
  const int32_t n =
      runs::findEqualRuns<S, true>(src, srcStep, roi.width, roi.height, norm == zelNormInf, l);
  const int64_t regions = runs::resolveLabels(l.runs, n, minLabel, maxLabel);
  paintRuns(l, dst, dstStep, roi.width, roi.height, clearGaps);
  *markersNum = int(regions);
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_SHARED_ENTRY(labelMarkersGetBufferSize)(ZeliSize roiSize, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  const int64_t bytes = runs::bufferBytes(roiSize.width, roiSize.height).value();
  if (bytes > INT32_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliLabelMarkers_8u_C1IR)(Zel8u* markers, int markersStep, ZeliSize roiSize, int minLabel,
                                      int maxLabel, int norm, int* markersNum, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(markers, markersStep)}, roiSize, {markersNum, buffer})) return s;
  if (ZelStatus s = checkLabelArgs(roiSize, minLabel, maxLabel, norm, 254)) return s;
  label(markers, markersStep, markers, markersStep, roiSize, minLabel, maxLabel, norm, markersNum, buffer, false);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliLabelMarkers_16u_C1IR)(Zel16u* markers, int markersStep, ZeliSize roiSize, int minLabel,
                                       int maxLabel, int norm, int* markersNum, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(markers, markersStep)}, roiSize, {markersNum, buffer})) return s;
  if (ZelStatus s = checkLabelArgs(roiSize, minLabel, maxLabel, norm, 65534)) return s;
  label(markers, markersStep, markers, markersStep, roiSize, minLabel, maxLabel, norm, markersNum, buffer, false);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliLabelMarkers_8u32s_C1R)(const Zel8u* src, int srcStep, Zel32s* markers, int markersStep,
                                        ZeliSize roiSize, int minLabel, int maxLabel, int norm, int* markersNum,
                                        Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(markers, markersStep)}, roiSize, {markersNum, buffer}))
    return s;
  if (ZelStatus s = checkLabelArgs(roiSize, minLabel, maxLabel, norm, INT32_MAX - 1)) return s;
  label(src, srcStep, markers, markersStep, roiSize, minLabel, maxLabel, norm, markersNum, buffer, true);
  return zelStatusOk;
}
