// Speckle marking: regions joined by small steps between 4-neighbours, and
// the small ones painted over. Runs are the horizontal stretches whose
// consecutive steps are small; a run joins a run of the row above where any
// shared column has a small vertical step. Region sizes are summed at the
// roots during the forward resolve, then the small regions' runs are painted.
#include <math.h>
#include <stdint.h>

#include "core/status.h"
#include "segment/label_runs.h"

namespace zelcv {
namespace {

using runs::Layout;
using runs::Run;

// |a - b| <= d in the type's arithmetic, and "takes part" (not the new value).
template <typename T>
struct Similar {
  T speckle;
  T diff;
  bool active(T v) const { return v != speckle; }
  bool near(T a, T b) const {
    const int32_t d = int32_t(a) - int32_t(b);
    return (d < 0 ? -d : d) <= int32_t(diff);
  }
};
template <>
struct Similar<float> {
  float speckle;
  float diff;
  bool active(float v) const { return !(v == speckle); }
  bool near(float a, float b) const { return fabsf(a - b) <= diff; }
};

template <typename T>
T* rowAt(T* base, int step, int y) {
  return reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(base) + int64_t(step) * y);
}

template <typename T>
void markSpeckles(T* img, int step, int w, int h, const Similar<T>& sim, int maxSize, Zel8u* buffer) {
  const Layout l = runs::place(buffer, h);
  Run* r = l.runs;
  int32_t n = 0;
  for (int y = 0; y < h; ++y) {
    const T* s = rowAt(img, step, y);
    const T* above = y > 0 ? rowAt(img, step, y - 1) : nullptr;
    l.rowStart[y] = n;
    const int32_t prevEnd = n;
    int32_t j = y > 0 ? l.rowStart[y - 1] : n;
    int x = 0;
    while (x < w) {
      if (!sim.active(s[x])) {
        ++x;
        continue;
      }
      int e = x;
      while (e + 1 < w && sim.active(s[e + 1]) && sim.near(s[e], s[e + 1])) ++e;
      r[n] = {x, e, n};
      if (above) {
        while (j < prevEnd && r[j].x1 < x) ++j;
        for (int32_t k = j; k < prevEnd && r[k].x0 <= e; ++k) {
          const int from = r[k].x0 > x ? r[k].x0 : x, to = r[k].x1 < e ? r[k].x1 : e;
          // A long overlap is scanned only when the runs are still apart; a
          // short one (most of them, in a rough picture) costs less than the
          // two root searches.
          if (to - from >= 4 && runs::findRoot(r, k) == runs::findRoot(r, n)) continue;
          for (int c = from; c <= to; ++c)
            if (sim.near(s[c], above[c])) {
              runs::unite(r, n, k);
              break;
            }
        }
      }
      ++n;
      x = e + 1;
    }
  }
  l.rowStart[h] = n;
  // Sizes: a root's parent becomes minus its region's size, every other run
  // points straight at its root.
  for (int32_t i = 0; i < n; ++i) {
    const int32_t p = r[i].parent;
    const int32_t len = r[i].x1 - r[i].x0 + 1;
    if (p == i) {
      r[i].parent = -len;
    } else {
      const int32_t root = r[p].parent < 0 ? p : r[p].parent;
      r[i].parent = root;
      r[root].parent -= len;
    }
  }
  for (int y = 0; y < h; ++y) {
    T* d = rowAt(img, step, y);
    for (int32_t i = l.rowStart[y]; i < l.rowStart[y + 1]; ++i) {
      const int32_t root = r[i].parent < 0 ? i : r[i].parent;
      if (-int64_t(r[root].parent) > maxSize) continue;
      for (int x = r[i].x0; x <= r[i].x1; ++x) d[x] = sim.speckle;
    }
  }
}

template <typename T>
ZelStatus run(T* img, int step, ZeliSize roi, T speckleVal, int maxSpeckleSize, T maxPixDiff, int norm,
              Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(img, step)}, roi, {buffer})) return s;
  if (runs::bufferBytes(roi.width, roi.height).value() > INT32_MAX) return zelStatusBadSize;
  if (norm != zelNormInf) return zelStatusBadNormType;
  if (maxSpeckleSize < 0 || !(maxPixDiff >= T(0))) return zelStatusBadArgument;
  if (maxSpeckleSize == 0) return zelStatusOk;
  markSpeckles(img, step, roi.width, roi.height, Similar<T>{speckleVal, maxPixDiff}, maxSpeckleSize, buffer);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliMarkSpecklesGetBufferSize)(ZeliSize roiSize, ZelDataType dataType, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  if (dataType != zel8u && dataType != zel16u && dataType != zel16s && dataType != zel32f)
    return zelStatusBadDataType;
  const int64_t bytes = runs::bufferBytes(roiSize.width, roiSize.height).value();
  if (bytes > INT32_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliMarkSpeckles_8u_C1IR)(Zel8u* srcDst, int srcDstStep, ZeliSize roiSize, Zel8u speckleVal,
                                      int maxSpeckleSize, Zel8u maxPixDiff, int norm, Zel8u* buffer) {
  return run(srcDst, srcDstStep, roiSize, speckleVal, maxSpeckleSize, maxPixDiff, norm, buffer);
}

ZELCV_ENTRY(zeliMarkSpeckles_16u_C1IR)(Zel16u* srcDst, int srcDstStep, ZeliSize roiSize, Zel16u speckleVal,
                                       int maxSpeckleSize, Zel16u maxPixDiff, int norm, Zel8u* buffer) {
  return run(srcDst, srcDstStep, roiSize, speckleVal, maxSpeckleSize, maxPixDiff, norm, buffer);
}

ZELCV_ENTRY(zeliMarkSpeckles_16s_C1IR)(Zel16s* srcDst, int srcDstStep, ZeliSize roiSize, Zel16s speckleVal,
                                       int maxSpeckleSize, Zel16s maxPixDiff, int norm, Zel8u* buffer) {
  return run(srcDst, srcDstStep, roiSize, speckleVal, maxSpeckleSize, maxPixDiff, norm, buffer);
}

ZELCV_ENTRY(zeliMarkSpeckles_32f_C1IR)(Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f speckleVal,
                                       int maxSpeckleSize, Zel32f maxPixDiff, int norm, Zel8u* buffer) {
  return run(srcDst, srcDstStep, roiSize, speckleVal, maxSpeckleSize, maxPixDiff, norm, buffer);
}
