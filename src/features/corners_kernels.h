// The corner measures' engine: gradient products per row, block sums down the
// columns and across them, and the responses. Each vector loop performs the
// scalar tail's float operations in the same order, so every path gives the
// same bits.
#ifndef ZELCV_FEATURES_CORNERS_KERNELS_H
#define ZELCV_FEATURES_CORNERS_KERNELS_H

#include <emmintrin.h>
#include <stddef.h>
#include <stdint.h>

#include <cfloat>
#include <climits>
#include <cmath>

#include "core/alloc.h"
#include "filter/border.h"
#include "zelcv.h"

namespace zelcv {
namespace corners {

enum class Measure { kMinEigenVal, kHarris, kEigenValsVecs };

struct Response {
  Measure measure;
  float k;  // Harris only
};

// (12 B + 40) W + 16 B + 256: see Workspace.
inline int64_t bufferBytes(int width, int blockSize) {
  return (12 * int64_t(blockSize) + 40) * width + 16 * int64_t(blockSize) + 256;
}

// The parts of the caller's buffer, each 16-byte aligned.
struct Workspace {
  uint8_t* gradientScratch;  // 9 W + 64 bytes: the derivative rows' own needs
  float* fx;                 // W
  float* fy;                 // W
  float* zero;               // W zero products (constant border)
  float* ring;               // B slots x 3 planes x W
  float* ext;                // 3 planes x (W + B): column sums with their border
  int* tags;                 // B: the image row each slot holds, INT_MIN for none
  Workspace(Zel8u* buffer, int width, int blockSize) {
    const size_t w = size_t(width), b = size_t(blockSize);
    uint8_t* p = alignUp(buffer, 16);
    gradientScratch = p;
    p = alignUp(p + 9 * w + 64, 16);
    fx = reinterpret_cast<float*>(p);
    fy = reinterpret_cast<float*>(alignUp(fx + w, 16));
    zero = reinterpret_cast<float*>(alignUp(fy + w, 16));
    ring = reinterpret_cast<float*>(alignUp(zero + w, 16));
    ext = reinterpret_cast<float*>(alignUp(ring + 3 * b * w, 16));
    tags = reinterpret_cast<int*>(alignUp(ext + 3 * (w + b), 16));
  }
};

inline void scaleRow16(const Zel16s* dx, const Zel16s* dy, float scale, float* fx, float* fy, int n) {
  int i = 0;
  const __m128 s = _mm_set1_ps(scale);
  for (; i + 8 <= n; i += 8) {
    const __m128i a = _mm_loadu_si128(reinterpret_cast<const __m128i*>(dx + i));
    const __m128i b = _mm_loadu_si128(reinterpret_cast<const __m128i*>(dy + i));
    const __m128i sa = _mm_srai_epi16(a, 15), sb = _mm_srai_epi16(b, 15);
    _mm_storeu_ps(fx + i, _mm_mul_ps(_mm_cvtepi32_ps(_mm_unpacklo_epi16(a, sa)), s));
    _mm_storeu_ps(fx + i + 4, _mm_mul_ps(_mm_cvtepi32_ps(_mm_unpackhi_epi16(a, sa)), s));
    _mm_storeu_ps(fy + i, _mm_mul_ps(_mm_cvtepi32_ps(_mm_unpacklo_epi16(b, sb)), s));
    _mm_storeu_ps(fy + i + 4, _mm_mul_ps(_mm_cvtepi32_ps(_mm_unpackhi_epi16(b, sb)), s));
  }
  for (; i < n; ++i) {
    fx[i] = float(dx[i]) * scale;
    fy[i] = float(dy[i]) * scale;
  }
}

inline void scaleRow32(float* fx, float* fy, float scale, int n) {
  int i = 0;
  const __m128 s = _mm_set1_ps(scale);
  for (; i + 4 <= n; i += 4) {
    _mm_storeu_ps(fx + i, _mm_mul_ps(_mm_loadu_ps(fx + i), s));
    _mm_storeu_ps(fy + i, _mm_mul_ps(_mm_loadu_ps(fy + i), s));
  }
  for (; i < n; ++i) {
    fx[i] = fx[i] * scale;
    fy[i] = fy[i] * scale;
  }
}

// xx, xy, yy of one row.
inline void productsRow(const float* fx, const float* fy, float* xx, float* xy, float* yy, int n) {
  int i = 0;
  for (; i + 4 <= n; i += 4) {
    const __m128 a = _mm_loadu_ps(fx + i), b = _mm_loadu_ps(fy + i);
    _mm_storeu_ps(xx + i, _mm_mul_ps(a, a));
    _mm_storeu_ps(xy + i, _mm_mul_ps(a, b));
    _mm_storeu_ps(yy + i, _mm_mul_ps(b, b));
  }
  for (; i < n; ++i) {
    xx[i] = fx[i] * fx[i];
    xy[i] = fx[i] * fy[i];
    yy[i] = fy[i] * fy[i];
  }
}

// out[i] = ((in[0][i] + in[1][i]) + ...) , rows in order.
inline void columnSum(const float* const* in, int count, float* out, int n) {
  int i = 0;
  for (; i + 4 <= n; i += 4) {
    __m128 acc = _mm_loadu_ps(in[0] + i);
    for (int t = 1; t < count; ++t) acc = _mm_add_ps(acc, _mm_loadu_ps(in[t] + i));
    _mm_storeu_ps(out + i, acc);
  }
  for (; i < n; ++i) {
    float acc = in[0][i];
    for (int t = 1; t < count; ++t) acc = acc + in[t][i];
    out[i] = acc;
  }
}

inline __m128 windowSum4(const float* e, int count) {
  __m128 acc = _mm_loadu_ps(e);
  for (int j = 1; j < count; ++j) acc = _mm_add_ps(acc, _mm_loadu_ps(e + j));
  return acc;
}

inline float windowSum1(const float* e, int count) {
  float acc = e[0];
  for (int j = 1; j < count; ++j) acc = acc + e[j];
  return acc;
}

inline float minEigen(float sxx, float sxy, float syy) {
  const float a = sxx * 0.5f, c = syy * 0.5f, d = a - c;
  return (a + c) - std::sqrt(d * d + sxy * sxy);
}

inline float harris(float sxx, float sxy, float syy, float k) {
  const float t = sxx + syy;
  return (sxx * syy - sxy * sxy) - k * (t * t);
}

// The eigenvector of eigenvalue l of [[a, b], [b, c]], normalised.
inline void eigenVector(double a, double b, double c, double l, float* out) {
  double x = b, y = l - a, e = std::fabs(x);
  if (e + std::fabs(y) < 1e-4) {
    y = b;
    x = l - c;
    e = std::fabs(x);
    if (e + std::fabs(y) < 1e-4) {
      e = 1.0 / (e + std::fabs(y) + FLT_EPSILON);
      x *= e;
      y *= e;
    }
  }
  const double d = 1.0 / std::sqrt(x * x + y * y + DBL_EPSILON);
  out[0] = float(x * d);
  out[1] = float(y * d);
}

inline void eigenValsVecs(float sxx, float sxy, float syy, float* out) {
  const double a = sxx, b = sxy, c = syy;
  const double u = (a + c) * 0.5;
  const double v = std::sqrt((a - c) * (a - c) * 0.25 + b * b);
  const double l1 = u + v, l2 = u - v;
  out[0] = float(l1);
  out[1] = float(l2);
  eigenVector(a, b, c, l1, out + 2);
  eigenVector(a, b, c, l2, out + 4);
}

// eigenValsVecs for two pixels at once: the same double operations, the
// rare branches of eigenVector computed for both lanes and chosen per lane.
inline void eigenVector2(__m128d a, __m128d b, __m128d c, __m128d l, __m128d* vx, __m128d* vy) {
  const __m128d absMask = _mm_castsi128_pd(_mm_set1_epi64x(0x7FFFFFFFFFFFFFFFll));
  const __m128d small = _mm_set1_pd(1e-4);
  const __m128d x1 = b, y1 = _mm_sub_pd(l, a);
  const __m128d first = _mm_cmplt_pd(_mm_add_pd(_mm_and_pd(x1, absMask), _mm_and_pd(y1, absMask)), small);
  const __m128d x2 = _mm_sub_pd(l, c), y2 = b;
  const __m128d sum2 = _mm_add_pd(_mm_and_pd(x2, absMask), _mm_and_pd(y2, absMask));
  const __m128d second = _mm_and_pd(first, _mm_cmplt_pd(sum2, small));
  const __m128d k = _mm_div_pd(_mm_set1_pd(1.0), _mm_add_pd(sum2, _mm_set1_pd(FLT_EPSILON)));
  auto pick = [](__m128d mask, __m128d yes, __m128d no) {
    return _mm_or_pd(_mm_and_pd(mask, yes), _mm_andnot_pd(mask, no));
  };
  const __m128d x = pick(second, _mm_mul_pd(x2, k), pick(first, x2, x1));
  const __m128d y = pick(second, _mm_mul_pd(y2, k), pick(first, y2, y1));
  const __m128d d = _mm_div_pd(
      _mm_set1_pd(1.0), _mm_sqrt_pd(_mm_add_pd(_mm_add_pd(_mm_mul_pd(x, x), _mm_mul_pd(y, y)), _mm_set1_pd(DBL_EPSILON))));
  *vx = _mm_mul_pd(x, d);
  *vy = _mm_mul_pd(y, d);
}

// Pixels i and i + 1 of sums held as floats in the low two lanes.
inline void eigenValsVecs2(__m128 sxx, __m128 sxy, __m128 syy, float* out) {
  const __m128d a = _mm_cvtps_pd(sxx), b = _mm_cvtps_pd(sxy), c = _mm_cvtps_pd(syy);
  const __m128d u = _mm_mul_pd(_mm_add_pd(a, c), _mm_set1_pd(0.5));
  const __m128d amc = _mm_sub_pd(a, c);
  const __m128d v = _mm_sqrt_pd(_mm_add_pd(_mm_mul_pd(_mm_mul_pd(amc, amc), _mm_set1_pd(0.25)), _mm_mul_pd(b, b)));
  const __m128d l1 = _mm_add_pd(u, v), l2 = _mm_sub_pd(u, v);
  __m128d x1, y1, x2, y2;
  eigenVector2(a, b, c, l1, &x1, &y1);
  eigenVector2(a, b, c, l2, &x2, &y2);
  // Per pixel: l1 l2 x1 y1 x2 y2.
  const __m128 ls = _mm_unpacklo_ps(_mm_cvtpd_ps(l1), _mm_cvtpd_ps(l2));
  const __m128 v1 = _mm_unpacklo_ps(_mm_cvtpd_ps(x1), _mm_cvtpd_ps(y1));
  const __m128 v2 = _mm_unpacklo_ps(_mm_cvtpd_ps(x2), _mm_cvtpd_ps(y2));
  _mm_storeu_ps(out, _mm_movelh_ps(ls, v1));
  _mm_storeu_ps(out + 4, _mm_shuffle_ps(v2, ls, _MM_SHUFFLE(3, 2, 1, 0)));
  _mm_storeu_ps(out + 8, _mm_movehl_ps(v2, v1));
}

// One output row from the three bordered column-sum rows.
inline void responseRow(const float* exx, const float* exy, const float* eyy, int count, int n,
                        const Response& r, float* out) {
  int i = 0;
  if (r.measure == Measure::kMinEigenVal) {
    const __m128 half = _mm_set1_ps(0.5f);
    for (; i + 4 <= n; i += 4) {
      const __m128 sxx = windowSum4(exx + i, count), sxy = windowSum4(exy + i, count);
      const __m128 syy = windowSum4(eyy + i, count);
      const __m128 a = _mm_mul_ps(sxx, half), c = _mm_mul_ps(syy, half), d = _mm_sub_ps(a, c);
      const __m128 root = _mm_sqrt_ps(_mm_add_ps(_mm_mul_ps(d, d), _mm_mul_ps(sxy, sxy)));
      _mm_storeu_ps(out + i, _mm_sub_ps(_mm_add_ps(a, c), root));
    }
    for (; i < n; ++i)
      out[i] = minEigen(windowSum1(exx + i, count), windowSum1(exy + i, count), windowSum1(eyy + i, count));
  } else if (r.measure == Measure::kHarris) {
    const __m128 k = _mm_set1_ps(r.k);
    for (; i + 4 <= n; i += 4) {
      const __m128 sxx = windowSum4(exx + i, count), sxy = windowSum4(exy + i, count);
      const __m128 syy = windowSum4(eyy + i, count);
      const __m128 t = _mm_add_ps(sxx, syy);
      const __m128 det = _mm_sub_ps(_mm_mul_ps(sxx, syy), _mm_mul_ps(sxy, sxy));
      _mm_storeu_ps(out + i, _mm_sub_ps(det, _mm_mul_ps(k, _mm_mul_ps(t, t))));
    }
    for (; i < n; ++i)
      out[i] = harris(windowSum1(exx + i, count), windowSum1(exy + i, count), windowSum1(eyy + i, count), r.k);
  } else {
    for (; i + 4 <= n; i += 4) {
      const __m128 sxx = windowSum4(exx + i, count), sxy = windowSum4(exy + i, count);
      const __m128 syy = windowSum4(eyy + i, count);
      eigenValsVecs2(sxx, sxy, syy, out + 6 * i);
      eigenValsVecs2(_mm_movehl_ps(sxx, sxx), _mm_movehl_ps(sxy, sxy), _mm_movehl_ps(syy, syy), out + 6 * i + 12);
    }
    for (; i < n; ++i)
      eigenValsVecs(windowSum1(exx + i, count), windowSum1(exy + i, count), windowSum1(eyy + i, count), out + 6 * i);
  }
}

// The whole image. G::row(y, fx, fy, scale) writes the scaled derivatives of
// image row y.
template <class G>
void run(const G& gradient, const Workspace& ws, ZeliSize roi, int blockSize, ZeliBorderType border, float scale,
         const Response& response, Zel32f* dst, int dstStep) {
  const int w = roi.width, h = roi.height, half = blockSize / 2, kind = borderKind(border);
  const size_t plane = size_t(w), slotFloats = 3 * plane, extRow = size_t(w) + size_t(blockSize);
  for (int s = 0; s < blockSize; ++s) ws.tags[s] = INT_MIN;
  for (size_t i = 0; i < plane; ++i) ws.zero[i] = 0.0f;
  int needed[32];
  const float* planes[3][32];
  for (int y = 0; y < h; ++y) {
    // Which image row (or -1: zero products) each window row stands for.
    for (int i = 0; i < blockSize; ++i) {
      const int m = y - half + i;
      needed[i] = (m < 0 || m >= h) ? (kind == zelBorderConstant ? -1 : borderIndex(m, h, kind)) : m;
    }
    for (int i = 0; i < blockSize; ++i) {
      const int m = needed[i];
      if (m < 0) {
        for (int p = 0; p < 3; ++p) planes[p][i] = ws.zero;
        continue;
      }
      int slot = -1;
      for (int s = 0; s < blockSize && slot < 0; ++s)
        if (ws.tags[s] == m) slot = s;
      if (slot < 0) {
        // A slot whose row no window row of this output row needs.
        for (int s = 0; s < blockSize && slot < 0; ++s) {
          bool used = false;
          for (int j = 0; j < blockSize; ++j) used = used || ws.tags[s] == needed[j];
          if (!used) slot = s;
        }
        ws.tags[slot] = m;
        float* base = ws.ring + size_t(slot) * slotFloats;
        gradient.row(m, ws.fx, ws.fy, scale);
        productsRow(ws.fx, ws.fy, base, base + plane, base + 2 * plane, w);
      }
      const float* base = ws.ring + size_t(slot) * slotFloats;
      for (int p = 0; p < 3; ++p) planes[p][i] = base + size_t(p) * plane;
    }
    for (int p = 0; p < 3; ++p) {
      float* e = ws.ext + size_t(p) * extRow;
      columnSum(planes[p], blockSize, e + half, w);
      for (int j = 0; j < blockSize - 1; ++j) {
        const int x = j < half ? j - half : w + (j - half);
        e[j < half ? j : w + j] = kind == zelBorderConstant ? 0.0f : e[half + borderIndex(x, w, kind)];
      }
    }
    float* out = reinterpret_cast<float*>(reinterpret_cast<uint8_t*>(dst) + ptrdiff_t(y) * dstStep);
    responseRow(ws.ext, ws.ext + extRow, ws.ext + 2 * extRow, blockSize, w, response, out);
  }
}

}  // namespace corners
}  // namespace zelcv

#endif  // ZELCV_FEATURES_CORNERS_KERNELS_H
