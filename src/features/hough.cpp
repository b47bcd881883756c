// The standard Hough transform for lines: votes of every set pixel into an
// angle x rho accumulator with a zero frame, local maxima above the
// threshold, sorted strongest first.
#include <emmintrin.h>

#include <algorithm>
#include <climits>
#include <cmath>
#include <cstring>

#include "core/alloc.h"
#include "core/status.h"
#include "kernels/simd.h"
#include "features/hough_kernels.h"

namespace zelcv {
namespace {

// Angles of the whole half turn, plus one for a region whose float bounds
// round up to one more.
int64_t fullAngles(float dtheta) {
  const int64_t a = hough::angleCount(hough::kPi, dtheta);
  return a < 0 ? -1 : a + 1;
}

int64_t houghBufferBytes(ZeliSize roi, ZeliPoint_32f delta) {
  const int64_t r = hough::rhoCells(roi, delta.x), a = fullAngles(delta.y);
  if (r < 0 || a < 0) return int64_t(1) << 40;
  return 4 * ((a + 2) * (r + 2) + a * (r + 1) + 2 * a) + 64;
}

struct Cell {
  int votes;
  int index;
};

ZelStatus houghLines(const Zel8u* src, int srcStep, ZeliSize roi, ZeliPoint_32f delta, int threshold,
                     const ZeliPoint_32f* range, ZeliPoint_32f* lines, int capacity, int* count, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep)}, roi, {lines, count, buffer})) return s;
  if (!hough::deltaValid(delta) || threshold < 0 || capacity < 0) return zelStatusBadArgument;
  float thetaMin = 0.0f, rhoMin = -INFINITY, rhoMax = INFINITY;
  double span = hough::kPi;
  if (range) {
    rhoMin = range[0].x;
    rhoMax = range[0].y;
    thetaMin = range[1].x;
    const float thetaMax = range[1].y;
    if (!(rhoMin <= rhoMax) || !(thetaMin >= 0.0f) || !(thetaMin < thetaMax) || !(thetaMax <= float(hough::kPi)))
      return zelStatusBadRange;
    span = double(thetaMax) - double(thetaMin);
  }
  if (houghBufferBytes(roi, delta) > INT_MAX) return zelStatusBadSize;
  const int64_t angles64 = hough::angleCount(span, delta.y);
  if (angles64 < 1) return zelStatusBadRange;

  const int rhos = int(hough::rhoCells(roi, delta.x)), angles = int(angles64);
  const int stride = rhos + 2;
  int* acc = reinterpret_cast<int*>(alignUp(buffer, 16));
  const size_t accCells = size_t(angles + 2) * stride;
  Cell* cells = reinterpret_cast<Cell*>(acc + accCells);
  float* cosTable = reinterpret_cast<float*>(acc + accCells + size_t(angles) * (rhos + 1));
  float* sinTable = cosTable + angles;
  std::memset(acc, 0, accCells * sizeof(int));
  hough::trigTables(angles, thetaMin, delta.y, delta.x, cosTable, sinTable);

  // Cell of (n, r): (n + 1) * stride + r + 1.
  const int offset = stride + 1 + (rhos - 1) / 2;
  for (int y = 0; y < roi.height; ++y) {
    const Zel8u* row = src + ptrdiff_t(y) * srcStep;
    int x = 0;
    for (; x + 16 <= roi.width; x += 16) {
      int bits = 0xFFFF ^ _mm_movemask_epi8(_mm_cmpeq_epi8(
                               _mm_loadu_si128(reinterpret_cast<const __m128i*>(row + x)), _mm_setzero_si128()));
      while (bits) {
        const int b = __builtin_ctz(unsigned(bits));
        hough::vote(acc, stride, offset, cosTable, sinTable, angles, x + b, y, 1);
        bits &= bits - 1;
      }
    }
    for (; x < roi.width; ++x)
      if (row[x]) hough::vote(acc, stride, offset, cosTable, sinTable, angles, x, y, 1);
  }

  // Local maxima: more than the cells before, at least the cells after.
  size_t found = 0;
  for (int n = 0; n < angles; ++n) {
    for (int r = 0; r < rhos; ++r) {
      const int base = (n + 1) * stride + r + 1;
      const int v = acc[base];
      if (v > threshold && v > acc[base - 1] && v >= acc[base + 1] && v > acc[base - stride] &&
          v >= acc[base + stride]) {
        const float rho = (float(r) - float(rhos - 1) * 0.5f) * delta.x;
        if (rho >= rhoMin && rho <= rhoMax) cells[found++] = Cell{v, n * rhos + r};
      }
    }
  }
  auto stronger = [](const Cell& a, const Cell& b) { return a.votes > b.votes || (a.votes == b.votes && a.index < b.index); };
  const size_t kept = std::min(found, size_t(capacity));
  std::partial_sort(cells, cells + kept, cells + found, stronger);
  for (size_t i = 0; i < kept; ++i) {
    const int n = cells[i].index / rhos, r = cells[i].index % rhos;
    // Callers may pass the line array at any address.
    const ZeliPoint_32f line{(float(r) - float(rhos - 1) * 0.5f) * delta.x, thetaMin + float(n) * delta.y};
    simd::storeOne(lines + i, line);
  }
  *count = int(kept);
  return found > kept ? zelStatusOutputFull : zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliHoughLineGetSize_8u_C1R)(ZeliSize roiSize, ZeliPoint_32f delta, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  if (!hough::deltaValid(delta)) return zelStatusBadArgument;
  const int64_t bytes = houghBufferBytes(roiSize, delta);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliHoughLine_8u32f_C1R)(const Zel8u* src, int srcStep, ZeliSize roiSize, ZeliPoint_32f delta,
                                     int threshold, ZeliPoint_32f* lines, int capacity, int* count, Zel8u* buffer) {
  return houghLines(src, srcStep, roiSize, delta, threshold, nullptr, lines, capacity, count, buffer);
}

ZELCV_ENTRY(zeliHoughLine_Region_8u32f_C1R)(const Zel8u* src, int srcStep, ZeliSize roiSize, ZeliPoint_32f delta,
                                            int threshold, const ZeliPoint_32f range[2], ZeliPoint_32f* lines,
                                            int capacity, int* count, Zel8u* buffer) {
  if (!range) return zelStatusNullPointer;
  return houghLines(src, srcStep, roiSize, delta, threshold, range, lines, capacity, count, buffer);
}
