// CopySubpix and CopySubpixIntersect: a window read at a fractional position
// by bilinear interpolation. The weights are the same for every window
// pixel, so a row is four streams of source values times four constants;
// the columns whose two taps lie inside the source run four at a time, the
// replicated ones one by one, with the same arithmetic.
#include "stats/subpix.h"

#include <emmintrin.h>
#include <stddef.h>
#include <string.h>

#include <cmath>

#include "core/load.h"
#include "core/status.h"

namespace zelcv {
namespace subpix {
namespace {

inline int64_t clampTo(int64_t v, int64_t lo, int64_t hi) { return v < lo ? lo : v > hi ? hi : v; }

template <typename S>
inline __m128 load4(const S* p);
template <>
inline __m128 load4(const float* p) {
  return _mm_loadu_ps(p);
}
template <>
inline __m128 load4(const uint8_t* p) {
  int32_t bytes;
  memcpy(&bytes, p, 4);
  const __m128i zero = _mm_setzero_si128();
  return _mm_cvtepi32_ps(_mm_unpacklo_epi16(_mm_unpacklo_epi8(_mm_cvtsi32_si128(bytes), zero), zero));
}
template <>
inline __m128 load4(const uint16_t* p) {
  const __m128i v = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(p));
  return _mm_cvtepi32_ps(_mm_unpacklo_epi16(v, _mm_setzero_si128()));
}

// Round to nearest (ties to even, the processor's default) and saturate.
inline uint8_t to8u(float v) {
  const int r = _mm_cvtss_si32(_mm_set_ss(v));
  return uint8_t(r < 0 ? 0 : r > 255 ? 255 : r);
}
inline void put(float* d, float v) { *d = v; }
inline void put(uint8_t* d, float v) { *d = to8u(v); }

inline void put4(float* d, __m128 v) { _mm_storeu_ps(d, v); }
inline void put4(uint8_t* d, __m128 v) {
  __m128i i = _mm_cvtps_epi32(v);
  i = _mm_packs_epi32(i, i);
  i = _mm_packus_epi16(i, i);
  const int32_t bytes = _mm_cvtsi128_si32(i);
  memcpy(d, &bytes, 4);
}

// ((s00 w00 + s01 w01) + s10 w10) + s11 w11, single precision.
inline float blend(float s00, float s01, float s10, float s11, const Placement& p) {
  return ((s00 * p.w00 + s01 * p.w01) + s10 * p.w10) + s11 * p.w11;
}

template <typename S>
inline const S* rowOf(const S* base, int step, int64_t y) {
  return reinterpret_cast<const S*>(reinterpret_cast<const char*>(base) + ptrdiff_t(step) * ptrdiff_t(y));
}

}  // namespace

bool place(ZeliPoint_32f centre, ZeliSize window, Placement* p) {
  if (!std::isfinite(centre.x) || !std::isfinite(centre.y)) return false;
  const float x0 = centre.x - float(window.width - 1) * 0.5f;
  const float y0 = centre.y - float(window.height - 1) * 0.5f;
  const float fx = std::floor(x0), fy = std::floor(y0);
  p->a = x0 - fx;
  p->b = y0 - fy;
  // Far outside, every tap is replicated anyway: keep the index in range.
  const float far = 17179869184.0f;  // 2^34
  p->ix = int64_t(fx < -far ? -far : fx > far ? far : fx);
  p->iy = int64_t(fy < -far ? -far : fy > far ? far : fy);
  p->w00 = (1.0f - p->a) * (1.0f - p->b);
  p->w01 = p->a * (1.0f - p->b);
  p->w10 = (1.0f - p->a) * p->b;
  p->w11 = p->a * p->b;
  return true;
}

ZeliRect insideRect(const Placement& p, ZeliSize source, ZeliSize window) {
  // Column i reads ix + i, and ix + i + 1 when a > 0.
  const int64_t x0 = clampTo(-p.ix, 0, window.width);
  const int64_t x1 = clampTo(int64_t(source.width) - (p.a > 0 ? 1 : 0) - p.ix, 0, window.width);
  const int64_t y0 = clampTo(-p.iy, 0, window.height);
  const int64_t y1 = clampTo(int64_t(source.height) - (p.b > 0 ? 1 : 0) - p.iy, 0, window.height);
  if (x1 <= x0 || y1 <= y0) return {0, 0, 0, 0};
  return {int(x0), int(y0), int(x1 - x0), int(y1 - y0)};
}

template <typename S, typename D>
void copyWindow(const S* src, int srcStep, ZeliSize srcSize, D* dst, int dstStep, ZeliSize window,
                const Placement& p) {
  const bool wide = useAvx2Kernels();
  const int64_t W = srcSize.width, H = srcSize.height;
  // Columns [lo, hi) have both taps inside the source.
  const int lo = int(clampTo(-p.ix, 0, window.width));
  const int hi = int(clampTo(W - 1 - p.ix, lo, window.width));
  const __m128 w00 = _mm_set1_ps(p.w00), w01 = _mm_set1_ps(p.w01), w10 = _mm_set1_ps(p.w10),
               w11 = _mm_set1_ps(p.w11);
  for (int j = 0; j < window.height; ++j) {
    const S* s0 = rowOf(src, srcStep, clampTo(p.iy + j, 0, H - 1));
    const S* s1 = rowOf(src, srcStep, clampTo(p.iy + j + 1, 0, H - 1));
    D* d = reinterpret_cast<D*>(reinterpret_cast<char*>(dst) + ptrdiff_t(dstStep) * j);
    auto replicated = [&](int i) {
      const int64_t c0 = clampTo(p.ix + i, 0, W - 1), c1 = clampTo(p.ix + i + 1, 0, W - 1);
      put(d + i, blend(float(s0[c0]), float(s0[c1]), float(s1[c0]), float(s1[c1]), p));
    };
    int i = 0;
    for (; i < lo; ++i) replicated(i);
    auto four = [&](int at) {
      const S* a0 = s0 + (p.ix + at);
      const S* a1 = s1 + (p.ix + at);
      __m128 v = _mm_add_ps(_mm_mul_ps(load4(a0), w00), _mm_mul_ps(load4(a0 + 1), w01));
      v = _mm_add_ps(v, _mm_mul_ps(load4(a1), w10));
      v = _mm_add_ps(v, _mm_mul_ps(load4(a1 + 1), w11));
      put4(d + at, v);
    };
    if (wide && hi - lo >= 8) {
      avx2::subpixInterior(s0 + (p.ix + lo), s1 + (p.ix + lo), d + lo, 0, hi - lo, p);
      i = hi;
    }
    for (; i + 4 <= hi; i += 4) four(i);
    // A ragged end of four or more columns: the last four again, overlapping
    // columns already written with the same values.
    if (i < hi && hi - lo >= 4) {
      four(hi - 4);
      i = hi;
    }
    for (; i < hi; ++i) {
      const S* a0 = s0 + (p.ix + i);
      const S* a1 = s1 + (p.ix + i);
      put(d + i, blend(float(a0[0]), float(a0[1]), float(a1[0]), float(a1[1]), p));
    }
    for (; i < window.width; ++i) replicated(i);
  }
}

template void copyWindow<uint8_t, uint8_t>(const uint8_t*, int, ZeliSize, uint8_t*, int, ZeliSize, const Placement&);
template void copyWindow<uint8_t, float>(const uint8_t*, int, ZeliSize, float*, int, ZeliSize, const Placement&);
template void copyWindow<uint16_t, float>(const uint16_t*, int, ZeliSize, float*, int, ZeliSize, const Placement&);
template void copyWindow<float, float>(const float*, int, ZeliSize, float*, int, ZeliSize, const Placement&);

namespace {

// Pointers, both sizes, both steps, step alignment, the centre, and for the
// intersecting copy a window with no pixel inside.
template <typename S, typename D>
ZelStatus copy(const S* src, int srcStep, ZeliSize srcRoi, D* dst, int dstStep, ZeliSize dstRoi,
               ZeliPoint_32f centre, ZeliRect* rect, bool intersect) {
  if (!src || !dst || (intersect && !rect)) return zelStatusNullPointer;
  if (checkSize(srcRoi) || checkSize(dstRoi)) return zelStatusBadSize;
  const ImageArg s = image(src, srcStep), d = image(dst, dstStep);
  if (srcStep <= 0 || srcStep < s.rowBytes(srcRoi.width) || dstStep <= 0 || dstStep < d.rowBytes(dstRoi.width))
    return zelStatusBadStep;
  if ((srcStep & s.alignMask) | (dstStep & d.alignMask)) return zelStatusMisalignedStep;
  Placement p;
  if (!place(centre, dstRoi, &p)) return zelStatusOutOfRange;
  ZeliRect inside = {};
  if (intersect) {
    inside = insideRect(p, srcRoi, dstRoi);
    if (inside.width == 0) return zelStatusOutOfRange;
  }
  copyWindow(src, srcStep, srcRoi, dst, dstStep, dstRoi, p);
  if (intersect) *rect = inside;
  return zelStatusOk;
}

}  // namespace
}  // namespace subpix
}  // namespace zelcv

using zelcv::subpix::copy;

#define ZELCV_SUBPIX_MEMBERS(S, D, tn)                                                                       \
  ZELCV_ENTRY(zeliCopySubpix_##tn##_C1R)(const S* src, int srcStep, ZeliSize srcRoiSize, D* dst, int dstStep, \
                                         ZeliSize dstRoiSize, ZeliPoint_32f centre) {                         \
    return copy(src, srcStep, srcRoiSize, dst, dstStep, dstRoiSize, centre, nullptr, false);                 \
  }                                                                                                           \
  ZELCV_ENTRY(zeliCopySubpixIntersect_##tn##_C1R)(const S* src, int srcStep, ZeliSize srcRoiSize, D* dst,    \
                                                  int dstStep, ZeliSize dstRoiSize, ZeliPoint_32f centre,    \
                                                  ZeliRect* inside) {                                         \
    return copy(src, srcStep, srcRoiSize, dst, dstStep, dstRoiSize, centre, inside, true);                   \
  }

ZELCV_SUBPIX_MEMBERS(Zel8u, Zel8u, 8u)
ZELCV_SUBPIX_MEMBERS(Zel8u, Zel32f, 8u32f)
ZELCV_SUBPIX_MEMBERS(Zel16u, Zel32f, 16u32f)
ZELCV_SUBPIX_MEMBERS(Zel32f, Zel32f, 32f)
