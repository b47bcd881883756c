// Small utilities: the pixels along a rasterised segment, a weighted sum of
// three channels, a fast arctangent in degrees, and the motion-history
// update.
#include <emmintrin.h>
#include <stddef.h>
#include <string.h>

#include <cmath>
#include <limits>
#include <type_traits>

#include "core/status.h"

namespace zelcv {
namespace {

template <typename T>
inline T* rowAt(T* base, int step, int y) {
  using Byte = typename std::conditional<std::is_const<T>::value, const char, char>::type;
  return reinterpret_cast<T*>(reinterpret_cast<Byte*>(base) + ptrdiff_t(step) * y);
}

// ---- SampleLine ----------------------------------------------------------
// 8-connected: the longer axis advances every step; err starts at
// D - 2d (D, d the longer and shorter extents) and the shorter axis advances
// with the step taken while err < 0, after which err gains 2D; every step
// err loses 2d.
template <typename T>
ZelStatus sampleLine(const T* src, int srcStep, ZeliSize roi, ZeliPoint p1, ZeliPoint p2, T* dst, int channels) {
  if (ZelStatus s = checkImages({image(src, srcStep, channels)}, roi, {dst})) return s;
  auto inside = [&](ZeliPoint p) { return p.x >= 0 && p.y >= 0 && p.x < roi.width && p.y < roi.height; };
  if (!inside(p1) || !inside(p2)) return zelStatusOutOfRange;
  int dx = p2.x - p1.x, dy = p2.y - p1.y;
  const int sx = dx < 0 ? -1 : 1, sy = dy < 0 ? -1 : 1;
  dx = dx < 0 ? -dx : dx;
  dy = dy < 0 ? -dy : dy;
  const bool xMajor = dx >= dy;
  const int D = xMajor ? dx : dy, d = xMajor ? dy : dx;
  int err = D - 2 * d;
  int x = p1.x, y = p1.y;
  for (int k = 0; k <= D; ++k) {
    const T* p = rowAt(src, srcStep, y) + ptrdiff_t(x) * channels;
    for (int c = 0; c < channels; ++c) dst[ptrdiff_t(k) * channels + c] = p[c];
    const bool minor = err < 0;
    err -= 2 * d;
    if (minor) err += 2 * D;
    if (xMajor) {
      x += sx;
      if (minor) y += sy;
    } else {
      y += sy;
      if (minor) x += sx;
    }
  }
  return zelStatusOk;
}

// ---- GradientColorToGray -------------------------------------------------
// Integer results: rounded to nearest (ties to even) within the type's
// range, below it (and NaN) 0, above it the largest value.
template <typename T>
inline void store(T* d, float v) {
  const float top = float(std::numeric_limits<T>::max());
  *d = !(v > 0.0f) ? T(0) : v >= top ? T(top) : T(_mm_cvtss_si32(_mm_set_ss(v)));
}
inline void store(float* d, float v) { *d = v; }

// (c0 s0 + c1 s1) + c2 s2 in single precision.
template <typename T>
ZelStatus colorToGray(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, const Zel32f* coeffs) {
  if (ZelStatus s = checkImages({image(src, srcStep, 3), image(dst, dstStep)}, roi, {coeffs})) return s;
  const float c0 = coeffs[0], c1 = coeffs[1], c2 = coeffs[2];
  for (int y = 0; y < roi.height; ++y) {
    const T* s = rowAt(src, srcStep, y);
    T* d = rowAt(dst, dstStep, y);
    for (int x = 0; x < roi.width; ++x)
      store(d + x, (c0 * float(s[3 * x]) + c1 * float(s[3 * x + 1])) + c2 * float(s[3 * x + 2]));
  }
  return zelStatusOk;
}

// ---- bFastArctan ---------------------------------------------------------
// atan(c) for 0 <= c <= 1 by an odd polynomial of degree 7, in degrees:
// c (p1 + c^2 (p3 + c^2 (p5 + c^2 p7))); the other octants by symmetry.
constexpr float kRadToDeg = float(180.0 / 3.14159265358979323846);
const float kP1 = 0.9997878412794807f * kRadToDeg;
const float kP3 = -0.3258083974640975f * kRadToDeg;
const float kP5 = 0.1555786518463281f * kRadToDeg;
const float kP7 = -0.04432655554792128f * kRadToDeg;
constexpr float kTiny = float(2.220446049250313e-16);  // keeps 0 / 0 at 0

inline float arctan(float y, float x) {
  const float ax = std::fabs(x), ay = std::fabs(y);
  const bool steep = ax < ay;
  const float c = steep ? ax / (ay + kTiny) : ay / (ax + kTiny);
  const float c2 = c * c;
  float a = (((kP7 * c2 + kP5) * c2 + kP3) * c2 + kP1) * c;
  if (steep) a = 90.0f - a;
  if (x < 0) a = 180.0f - a;
  if (y < 0) a = 360.0f - a;
  return a;
}

inline __m128 select(__m128 m, __m128 a, __m128 b) { return _mm_or_ps(_mm_and_ps(m, a), _mm_andnot_ps(m, b)); }

inline __m128 arctan4(__m128 y, __m128 x) {
  const __m128 sign = _mm_set1_ps(-0.0f), zero = _mm_setzero_ps(), tiny = _mm_set1_ps(kTiny);
  const __m128 ax = _mm_andnot_ps(sign, x), ay = _mm_andnot_ps(sign, y);
  const __m128 steep = _mm_cmplt_ps(ax, ay);
  const __m128 c = _mm_div_ps(select(steep, ax, ay), _mm_add_ps(select(steep, ay, ax), tiny));
  const __m128 c2 = _mm_mul_ps(c, c);
  __m128 a = _mm_add_ps(_mm_mul_ps(_mm_set1_ps(kP7), c2), _mm_set1_ps(kP5));
  a = _mm_add_ps(_mm_mul_ps(a, c2), _mm_set1_ps(kP3));
  a = _mm_add_ps(_mm_mul_ps(a, c2), _mm_set1_ps(kP1));
  a = _mm_mul_ps(a, c);
  a = select(steep, _mm_sub_ps(_mm_set1_ps(90.0f), a), a);
  a = select(_mm_cmplt_ps(x, zero), _mm_sub_ps(_mm_set1_ps(180.0f), a), a);
  return select(_mm_cmplt_ps(y, zero), _mm_sub_ps(_mm_set1_ps(360.0f), a), a);
}

// ---- UpdateMotionHistory -------------------------------------------------
template <typename S>
inline bool moving(S v) {
  return v != S(0);
}

template <typename S>
ZelStatus motionHistory(const S* sil, int silStep, Zel32f* mhi, int mhiStep, ZeliSize roi, Zel32f timestamp,
                        Zel32f duration) {
  if (ZelStatus s = checkImages({image(sil, silStep), image(mhi, mhiStep)}, roi)) return s;
  const float bound = timestamp - duration;
  for (int y = 0; y < roi.height; ++y) {
    const S* s = rowAt(sil, silStep, y);
    float* m = rowAt(mhi, mhiStep, y);
    int x = 0;
    if constexpr (sizeof(S) == 1) {
      const __m128 ts = _mm_set1_ps(timestamp), lim = _mm_set1_ps(bound);
      const __m128i zero = _mm_setzero_si128();
      for (; x + 4 <= roi.width; x += 4) {
        int32_t bytes;
        memcpy(&bytes, s + x, 4);
        __m128i still = _mm_cmpeq_epi8(_mm_cvtsi32_si128(bytes), zero);
        still = _mm_unpacklo_epi8(still, still);
        const __m128 keep = _mm_castsi128_ps(_mm_unpacklo_epi16(still, still));
        const __m128 old = _mm_loadu_ps(m + x);
        const __m128 aged = _mm_andnot_ps(_mm_cmplt_ps(old, lim), old);  // old < bound: 0
        _mm_storeu_ps(m + x, select(keep, aged, ts));
      }
    }
    for (; x < roi.width; ++x) m[x] = moving(s[x]) ? timestamp : (m[x] < bound ? 0.0f : m[x]);
  }
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliSampleLine_8u_C1R)(const Zel8u* src, int srcStep, ZeliSize roiSize, ZeliPoint point1,
                                   ZeliPoint point2, Zel8u* dst) {
  return sampleLine(src, srcStep, roiSize, point1, point2, dst, 1);
}
ZELCV_ENTRY(zeliSampleLine_8u_C3R)(const Zel8u* src, int srcStep, ZeliSize roiSize, ZeliPoint point1,
                                   ZeliPoint point2, Zel8u* dst) {
  return sampleLine(src, srcStep, roiSize, point1, point2, dst, 3);
}
ZELCV_ENTRY(zeliSampleLine_32f_C1R)(const Zel32f* src, int srcStep, ZeliSize roiSize, ZeliPoint point1,
                                    ZeliPoint point2, Zel32f* dst) {
  return sampleLine(src, srcStep, roiSize, point1, point2, dst, 1);
}

ZELCV_ENTRY(zeliGradientColorToGray_8u_C3C1R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                              ZeliSize roiSize, const Zel32f* coeffs) {
  return colorToGray(src, srcStep, dst, dstStep, roiSize, coeffs);
}
ZELCV_ENTRY(zeliGradientColorToGray_16u_C3C1R)(const Zel16u* src, int srcStep, Zel16u* dst, int dstStep,
                                               ZeliSize roiSize, const Zel32f* coeffs) {
  return colorToGray(src, srcStep, dst, dstStep, roiSize, coeffs);
}
ZELCV_ENTRY(zeliGradientColorToGray_32f_C3C1R)(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                                               ZeliSize roiSize, const Zel32f* coeffs) {
  return colorToGray(src, srcStep, dst, dstStep, roiSize, coeffs);
}

ZELCV_ENTRY(zelibFastArctan_32f)(const Zel32f* srcY, const Zel32f* srcX, Zel32f* dst, int length) {
  if (!srcY || !srcX || !dst) return zelStatusNullPointer;
  if (length < 1) return zelStatusBadSize;
  int i = 0;
  for (; i + 4 <= length; i += 4) _mm_storeu_ps(dst + i, arctan4(_mm_loadu_ps(srcY + i), _mm_loadu_ps(srcX + i)));
  for (; i < length; ++i) dst[i] = arctan(srcY[i], srcX[i]);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliUpdateMotionHistory_8u32f_C1IR)(const Zel8u* silhouette, int silhouetteStep, Zel32f* mhi,
                                                int mhiStep, ZeliSize roiSize, Zel32f timestamp,
                                                Zel32f duration) {
  return motionHistory(silhouette, silhouetteStep, mhi, mhiStep, roiSize, timestamp, duration);
}
ZELCV_ENTRY(zeliUpdateMotionHistory_16u32f_C1IR)(const Zel16u* silhouette, int silhouetteStep, Zel32f* mhi,
                                                 int mhiStep, ZeliSize roiSize, Zel32f timestamp,
                                                 Zel32f duration) {
  return motionHistory(silhouette, silhouetteStep, mhi, mhiStep, roiSize, timestamp, duration);
}
ZELCV_ENTRY(zeliUpdateMotionHistory_32f_C1IR)(const Zel32f* silhouette, int silhouetteStep, Zel32f* mhi,
                                              int mhiStep, ZeliSize roiSize, Zel32f timestamp,
                                              Zel32f duration) {
  return motionHistory(silhouette, silhouetteStep, mhi, mhiStep, roiSize, timestamp, duration);
}
