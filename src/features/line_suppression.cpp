// Line suppression: feature pixels on straight edges are dropped, those in
// textured or cornered neighbourhoods kept. The gradient products are exact
// integers (3x3 Sobel of 8-bit pixels) and every window sum fits in 32 bits
// (31 x 31 x 1020^2 < 2^31), so the sums slide: a row enters and a row
// leaves the column sums, a column enters and one leaves the window.
#include <climits>
#include <cmath>
#include <cstring>

#include "core/alloc.h"
#include "core/status.h"
#include "filter/derivative.h"

namespace zelcv {
namespace {

int64_t suppressionBufferBytes(int width, int window) {
  return (12 * int64_t(window) + 16) * (int64_t(width) + 32) + 8 * int64_t(width) + 256;
}

bool windowValid(int window) { return window >= 3 && window <= 31 && (window & 1); }

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliLineSuppressionGetBufferSize)(ZeliSize roiSize, int windowSize, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  if (!windowValid(windowSize)) return zelStatusBadMaskSize;
  const int64_t bytes = suppressionBufferBytes(roiSize.width, windowSize);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliLineSuppression_8u_C1R)(const Zel8u* src, int srcStep, const Zel8u* feature, int featureStep,
                                        Zel8u* dst, int dstStep, ZeliSize roiSize, int windowSize, Zel32f ratio,
                                        Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep), maskImage(feature, featureStep), image(dst, dstStep)}, roiSize,
                                {buffer}))
    return s;
  if (!windowValid(windowSize)) return zelStatusBadMaskSize;
  if (!std::isfinite(ratio) || !(ratio > 1.0f)) return zelStatusBadArgument;
  if (suppressionBufferBytes(roiSize.width, windowSize) > INT_MAX) return zelStatusBadSize;

  const int w = roiSize.width, h = roiSize.height, half = windowSize / 2;
  const size_t n = size_t(w);
  int32_t* ring = reinterpret_cast<int32_t*>(alignUp(buffer, 16));  // window x 3 planes x w
  int32_t* cols = ring + size_t(windowSize) * 3 * n;                 // 3 planes x w
  Zel16s* dx = reinterpret_cast<Zel16s*>(cols + 3 * n);
  Zel16s* dy = dx + n;
  const DerivativeRows rows(src, srcStep, roiSize, DerivativeKernel::kSobel3x3, zelBorderReplicate, 0, dy + n);
  std::memset(cols, 0, 3 * n * sizeof(int32_t));
  auto slot = [&](int y) { return ring + size_t(y % windowSize) * 3 * n; };
  auto enter = [&](int y) {
    int32_t* p = slot(y);
    rows.row(y, dx, dy);
    for (size_t x = 0; x < n; ++x) {
      p[x] = dx[x] * dx[x];
      p[n + x] = dx[x] * dy[x];
      p[2 * n + x] = dy[x] * dy[x];
      for (int c = 0; c < 3; ++c) cols[c * n + x] += p[c * n + x];
    }
  };
  auto leave = [&](int y) {
    const int32_t* p = slot(y);
    for (size_t i = 0; i < 3 * n; ++i) cols[i] -= p[i];
  };
  const double r = double(ratio), r1 = (r + 1.0) * (r + 1.0);
  for (int y = 0; y < half && y < h; ++y) enter(y);
  for (int y = 0; y < h; ++y) {
    // The leaving row's slot is the one the entering row takes.
    if (y - half - 1 >= 0) leave(y - half - 1);
    if (y + half < h) enter(y + half);
    const Zel8u* f = feature + ptrdiff_t(y) * featureStep;
    Zel8u* out = dst + ptrdiff_t(y) * dstStep;
    int64_t sxx = 0, sxy = 0, syy = 0;
    for (int x = 0; x < half && x < w; ++x) {
      sxx += cols[x];
      sxy += cols[n + x];
      syy += cols[2 * n + x];
    }
    for (int x = 0; x < w; ++x) {
      if (x + half < w) {
        sxx += cols[x + half];
        sxy += cols[n + x + half];
        syy += cols[2 * n + x + half];
      }
      if (x - half - 1 >= 0) {
        sxx -= cols[x - half - 1];
        sxy -= cols[n + x - half - 1];
        syy -= cols[2 * n + x - half - 1];
      }
      bool keep = false;
      if (f[x]) {
        const int64_t det = sxx * syy - sxy * sxy, tr = sxx + syy;
        const double t = double(tr);
        keep = (r * t) * t < r1 * double(det);
      }
      out[x] = keep ? f[x] : 0;
    }
  }
  return zelStatusOk;
}
