// Exact Euclidean distance transform, separable: a column pass finds each
// pixel's distance to the nearest feature in its column, then every row takes
// the lower envelope of the parabolas (x - q)^2 + g(q)^2 over its columns q.
// Distances along a column are small integers, exact in single precision, so
// the column pass keeps them in the destination; the envelope works in double
// precision, where squares and the breakpoints between parabolas stay exact
// enough that every integer position picks a parabola of the minimum value.
#include <float.h>
#include <math.h>
#include <stdint.h>
#include <string.h>

#include <algorithm>

#include <emmintrin.h>

#include "core/alloc.h"
#include "core/status.h"

namespace zelcv {
namespace {

int64_t trueBufferBytes(ZeliSize roi) {
  const int64_t n = std::max(alignSize(roi.width, 4), alignSize(roi.height, 4));
  return 24 * n + 56;
}

float* rowOf(Zel32f* base, int step, int y) {
  return reinterpret_cast<float*>(reinterpret_cast<uint8_t*>(base) + int64_t(step) * y);
}

// Lanes of `s` that hold 0, widened to four 32-bit masks.
inline __m128 featureMask4(const uint8_t* s) {
  int32_t four;
  memcpy(&four, s, 4);
  __m128i z = _mm_cmpeq_epi8(_mm_cvtsi32_si128(four), _mm_setzero_si128());
  z = _mm_unpacklo_epi8(z, z);
  return _mm_castsi128_ps(_mm_unpacklo_epi16(z, z));
}

// Column distances, top to bottom: 0 at a feature, the row above + 1
// elsewhere; `none` (the largest float) stands for no feature so far, and
// none + 1 rounds back to none.
void columnsDown(const uint8_t* s, const float* above, float* out, int w) {
  const __m128 one = _mm_set1_ps(1.0f);
  int x = 0;
  for (; x + 4 <= w; x += 4)
    _mm_storeu_ps(out + x, _mm_andnot_ps(featureMask4(s + x), _mm_add_ps(_mm_loadu_ps(above + x), one)));
  for (; x < w; ++x) out[x] = s[x] == 0 ? 0.0f : above[x] + 1.0f;
}

// Bottom to top: the smaller of the pixel's value and the row below + 1,
// kept in `below` too for the next row up.
void columnsUp(float* below, float* out, int w) {
  const __m128 one = _mm_set1_ps(1.0f);
  int x = 0;
  for (; x + 4 <= w; x += 4) {
    const __m128 v = _mm_min_ps(_mm_loadu_ps(out + x), _mm_add_ps(_mm_loadu_ps(below + x), one));
    _mm_storeu_ps(out + x, v);
    _mm_storeu_ps(below + x, v);
  }
  for (; x < w; ++x) out[x] = below[x] = std::min(out[x], below[x] + 1.0f);
}

struct Envelope {
  int32_t* site;       // column of each parabola
  float* g;            // its column distance
  double* start;       // where it starts to be the lowest; one more entry than parabolas
};

// Square roots of a row of squared distances, all below 2^24 and so exact in
// single precision: the single-precision root of such an integer is the
// float nearest to its exact root.
void rootsOfSmallSquares(float* g, int w) {
  int x = 0;
  for (; x + 4 <= w; x += 4) _mm_storeu_ps(g + x, _mm_sqrt_ps(_mm_loadu_ps(g + x)));
  for (; x < w; ++x) g[x] = sqrtf(g[x]);
}

// The envelope in integers, for rows and columns up to 2^20 long: parabola k
// (site p, f = g^2 + p^2) is the lowest from (f_k - f_{k-1}) / (2 (p_k -
// p_{k-1})) on, and two such breakpoints compare by cross-multiplying, exact
// in 64 bits at these sizes -- no division, and no rounding to reason about.
void envelopeRowExact(float* g, int w, int32_t* site, int64_t* f) {
  int k = -1;
  for (int q = 0; q < w; ++q) {
    if (g[q] == FLT_MAX) continue;  // no feature in this column
    const int64_t gq = int64_t(g[q]), fq = gq * gq + int64_t(q) * q;
    // Drop the parabolas that the new one hides: those whose breakpoint is
    // not left of the new one's with them. The first starts at -infinity.
    while (k > 0) {
      const int64_t n = fq - f[k], d = 2 * int64_t(q - site[k]);
      const int64_t nk = f[k] - f[k - 1], dk = 2 * int64_t(site[k] - site[k - 1]);
      if (n * dk > nk * d) break;
      --k;
    }
    ++k;
    site[k] = q;
    f[k] = fq;
  }
  if (k < 0) return;  // no feature anywhere: the row keeps the largest float
  // Squared distances below 2^24 are exact in single precision, and rooted
  // in one pass; from the first larger one on, the row takes double roots.
  bool small = true;
  int j = 0;
  // The current parabola and its successor's breakpoint, kept in registers.
  int64_t fj = f[0], twoSite = 2 * int64_t(site[0]), nextN = 0, nextD = 0;
  auto follow = [&]() {
    if (j < k) {
      nextN = f[j + 1] - f[j];
      nextD = 2 * int64_t(site[j + 1] - site[j]);
    }
  };
  follow();
  for (int x = 0; x < w; ++x) {
    while (j < k && int64_t(x) * nextD >= nextN) {
      ++j;
      fj = f[j];
      twoSite = 2 * int64_t(site[j]);
      follow();
    }
    const int64_t d2 = fj + int64_t(x) * (int64_t(x) - twoSite);
    if (small && d2 >= 16777216) {
      small = false;
      rootsOfSmallSquares(g, x);
    }
    g[x] = small ? float(d2) : float(sqrt(double(d2)));
  }
  if (small) rootsOfSmallSquares(g, w);
}

// One row: on entry `g` holds the column distances, on return the distances.
// The breakpoints in double precision, for rows too long for the exact form.
void envelopeRow(float* g, int w, const Envelope& e) {
  int k = -1;
  for (int q = 0; q < w; ++q) {
    if (g[q] == FLT_MAX) continue;  // no feature in this column
    const double fq = double(g[q]) * g[q] + double(q) * q;
    double s = -HUGE_VAL;
    while (k >= 0) {
      const int p = e.site[k];
      s = (fq - (double(e.g[k]) * e.g[k] + double(p) * p)) / (2.0 * (q - p));
      if (s > e.start[k]) break;
      --k;
      s = -HUGE_VAL;
    }
    ++k;
    e.site[k] = q;
    e.g[k] = g[q];
    e.start[k] = s;
  }
  if (k < 0) return;  // no feature anywhere: the row keeps the largest float
  e.start[k + 1] = HUGE_VAL;
  // Squared distances below 2^24 are exact in single precision, and the
  // single-precision root of such an integer is the float nearest to its
  // exact root, so they take the vector root; larger ones the double one.
  bool small = true;
  int j = 0;
  for (int x = 0; x < w; ++x) {
    while (e.start[j + 1] <= x) ++j;
    const double dx = double(x - e.site[j]), d2 = dx * dx + double(e.g[j]) * e.g[j];
    small &= d2 < 16777216.0;
    g[x] = small ? float(d2) : float(sqrt(d2));
    if (!small) {
      // Redo the roots of the values already stored as squares.
      for (int i = 0; i < x; ++i) g[i] = sqrtf(g[i]);
      for (++x; x < w; ++x) {
        while (e.start[j + 1] <= x) ++j;
        const double ex = double(x - e.site[j]);
        g[x] = float(sqrt(ex * ex + double(e.g[j]) * e.g[j]));
      }
      return;
    }
  }
  int x = 0;
  for (; x + 4 <= w; x += 4) _mm_storeu_ps(g + x, _mm_sqrt_ps(_mm_loadu_ps(g + x)));
  for (; x < w; ++x) g[x] = sqrtf(g[x]);
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliTrueDistanceTransformGetBufferSize_8u32f_C1R)(ZeliSize roiSize, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  const int64_t bytes = trueBufferBytes(roiSize);
  if (bytes > INT32_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliTrueDistanceTransform_8u32f_C1R)(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                                 ZeliSize roiSize, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep)}, roiSize, {buffer})) return s;
  // No buffer can serve a size that the query refuses.
  if (trueBufferBytes(roiSize) > INT32_MAX) return zelStatusBadSize;
  const int w = roiSize.width, h = roiSize.height;
  const int64_t n = std::max(alignSize(w, 4), alignSize(h, 4));
  // Buffer, from an 8-byte boundary: a row of column distances (4n bytes),
  // first the row of largest floats above the image, then a copy of the row
  // below for the upward column pass; the envelope's sites (4n), column
  // distances (4n) and breakpoints (8n + 8).
  uint8_t* p = alignUp(buffer, 8);
  float* line = reinterpret_cast<float*>(p);
  const Envelope e = {reinterpret_cast<int32_t*>(p + 4 * n), reinterpret_cast<float*>(p + 8 * n),
                      reinterpret_cast<double*>(p + 16 * n)};
  for (int x = 0; x < w; ++x) line[x] = FLT_MAX;
  const bool exact = w <= (1 << 20) && h <= (1 << 20);
  int64_t* f = reinterpret_cast<int64_t*>(e.start);
  auto finishRow = [&](float* row) {
    if (exact)
      envelopeRowExact(row, w, e.site, f);
    else
      envelopeRow(row, w, e);
  };

  const float* above = line;
  for (int y = 0; y < h; ++y) {
    float* out = rowOf(dst, dstStep, y);
    columnsDown(src + int64_t(srcStep) * y, above, out, w);
    above = out;
  }
  // Upwards, each row finished while it is still in the cache.
  memcpy(line, rowOf(dst, dstStep, h - 1), sizeof(float) * size_t(w));
  finishRow(rowOf(dst, dstStep, h - 1));
  for (int y = h - 2; y >= 0; --y) {
    float* out = rowOf(dst, dstStep, y);
    columnsUp(line, out, w);
    finishRow(out);
  }
  return zelStatusOk;
}
