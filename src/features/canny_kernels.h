// Inner loops of the Canny detector: gradient magnitude with direction codes,
// thinning of one row against its neighbours, and hysteresis from a stack of
// strong pixels. Vector and scalar paths give identical results: every value
// is compared as a single-precision float with the same operations.
#ifndef ZELCV_FEATURES_CANNY_KERNELS_H
#define ZELCV_FEATURES_CANNY_KERNELS_H

#include <emmintrin.h>

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "kernels/simd.h"
#include "zelcv.h"

namespace zelcv {
namespace canny {

using IntVec = simd::Vec<int16_t>;
using FloatVec = simd::Vec<float>;

// tan(22.5 degrees) and tan(67.5 degrees) as single-precision constants;
// 2 + kTan22 is exactly kTan67 in single precision.
constexpr float kTan22 = 0x1.A8279Ap-2f;  // bits 0x3ED413CD
constexpr float kTan67 = 0x1.3504F4p+1f;  // bits 0x401A827A

// Quantised gradient directions. Only the sign of dx * dy matters for the
// two diagonals.
enum Direction : uint8_t {
  kHorizontal = 0,    // compare with the left and right neighbours
  kVertical = 1,      // compare with the up and down neighbours
  kDiagonalSame = 2,  // dx, dy of equal sign: up-left and down-right
  kDiagonalOpposite = 3,
  kNone = 4  // no magnitude: never a maximum
};

constexpr uint8_t kCandidate = 128;
constexpr uint8_t kEdge = 255;

// How a magnitude passes the low threshold: the derivative-input entries keep
// m == low, the image entry keeps only m > low.
enum class LowRule { kKeepEqual, kStrict };
enum class Norm { kL1, kL2 };

template <LowRule R>
inline bool passesLow(float m, float low) {
  return R == LowRule::kKeepEqual ? !(m < low) : m > low;
}

inline uint8_t direction(float ax, float ay, bool sameSign) {
  if (kTan67 * ax < ay) return kVertical;
  if (ay < kTan22 * ax) return kHorizontal;
  return sameSign ? kDiagonalSame : kDiagonalOpposite;
}

// One pixel's magnitude (after the low threshold) and direction code.
template <LowRule R, Norm N>
inline float pixelMagnitude(Zel16s dx, Zel16s dy, float low, uint8_t* code) {
  const int ix = dx < 0 ? -int(dx) : int(dx);
  const int iy = dy < 0 ? -int(dy) : int(dy);
  const float m = N == Norm::kL2 ? float(std::sqrt(double(dx) * dx + double(dy) * dy)) : float(ix + iy);
  if (!passesLow<R>(m, low) || m == 0.0f) {
    *code = kNone;
    return 0.0f;
  }
  *code = direction(float(ix), float(iy), (dx ^ dy) >= 0);
  return m;
}

template <LowRule R, Norm N>
inline float pixelMagnitude(Zel32f dx, Zel32f dy, float low, uint8_t* code) {
  static_assert(N == Norm::kL1, "float derivatives use the L1 norm");
  const float ax = std::fabs(dx), ay = std::fabs(dy);
  const float m = ax + ay;
  if (!passesLow<R>(m, low) || m == 0.0f) {
    *code = kNone;
    return 0.0f;
  }
  *code = direction(ax, ay, std::signbit(dx) == std::signbit(dy));
  return m;
}

// ---- Vector magnitude ------------------------------------------------------

struct MagnitudeLanes {
  __m128 m;       // magnitude before the threshold
  __m128 ax, ay;  // absolute derivatives
  __m128i opposite;  // all ones where the signs of dx and dy differ
};

inline __m128i absInt32(__m128i v) {
  __m128i s = _mm_srai_epi32(v, 31);
  return _mm_sub_epi32(_mm_xor_si128(v, s), s);
}

// dx, dy as 32-bit lanes; for L2, squares holds dx * dx + dy * dy (exact in
// 32 bits while neither derivative is -32768).
template <Norm N>
inline MagnitudeLanes lanesFromInt32(__m128i dx, __m128i dy, __m128i squares) {
  MagnitudeLanes l;
  __m128i ix = absInt32(dx), iy = absInt32(dy);
  l.ax = _mm_cvtepi32_ps(ix);
  l.ay = _mm_cvtepi32_ps(iy);
  l.opposite = _mm_srai_epi32(_mm_xor_si128(dx, dy), 31);
  if (N == Norm::kL1) {
    l.m = _mm_cvtepi32_ps(_mm_add_epi32(ix, iy));
  } else {
    __m128d s0 = _mm_sqrt_pd(_mm_cvtepi32_pd(squares));
    __m128d s1 = _mm_sqrt_pd(_mm_cvtepi32_pd(_mm_shuffle_epi32(squares, 0xEE)));
    l.m = _mm_movelh_ps(_mm_cvtpd_ps(s0), _mm_cvtpd_ps(s1));
  }
  return l;
}

// The largest sum of squares whose L2 magnitude fails the low threshold: the
// magnitude grows with the sum, so blocks at or below it need no root.
template <LowRule R>
int32_t squaredLowLimit(float low) {
  auto passes = [&](int64_t s) { return passesLow<R>(float(std::sqrt(double(s))), low); };
  if (passes(0)) return -1;
  int64_t fail = 0, pass = INT32_MAX;
  if (!passes(pass)) return INT32_MAX;
  while (pass - fail > 1) {
    const int64_t mid = fail + (pass - fail) / 2;
    (passes(mid) ? pass : fail) = mid;
  }
  return int32_t(fail);
}

inline MagnitudeLanes lanesFromFloat(__m128 dx, __m128 dy) {
  MagnitudeLanes l;
  const __m128 absMask = _mm_castsi128_ps(_mm_set1_epi32(0x7FFFFFFF));
  l.ax = _mm_and_ps(dx, absMask);
  l.ay = _mm_and_ps(dy, absMask);
  l.m = _mm_add_ps(l.ax, l.ay);
  l.opposite = _mm_srai_epi32(_mm_xor_si128(_mm_castps_si128(dx), _mm_castps_si128(dy)), 31);
  return l;
}

// Thresholded magnitude into `mag` and the direction codes as 32-bit lanes.
template <LowRule R>
inline __m128i finishLanes(const MagnitudeLanes& l, __m128 low, float* mag) {
  __m128 keep = R == LowRule::kKeepEqual ? _mm_cmpnlt_ps(l.m, low) : _mm_cmpgt_ps(l.m, low);
  keep = _mm_and_ps(keep, _mm_cmpneq_ps(l.m, _mm_setzero_ps()));
  FloatVec::storeu(mag, _mm_and_ps(keep, l.m));
  const __m128i vertical = _mm_castps_si128(_mm_cmplt_ps(_mm_mul_ps(_mm_set1_ps(kTan67), l.ax), l.ay));
  const __m128i horizontal = _mm_castps_si128(_mm_cmplt_ps(l.ay, _mm_mul_ps(_mm_set1_ps(kTan22), l.ax)));
  // Diagonal codes 2 or 3; horizontal 0 overrides; vertical 1 overrides both.
  __m128i code = _mm_sub_epi32(_mm_set1_epi32(kDiagonalSame), l.opposite);
  code = _mm_andnot_si128(horizontal, code);
  code = _mm_or_si128(_mm_andnot_si128(vertical, code), _mm_and_si128(vertical, _mm_set1_epi32(kVertical)));
  const __m128i k = _mm_castps_si128(keep);
  return _mm_or_si128(_mm_and_si128(k, code), _mm_andnot_si128(k, _mm_set1_epi32(kNone)));
}

inline void storeCodes8(uint8_t* codes, __m128i lo, __m128i hi) {
  __m128i w = _mm_packs_epi32(lo, hi);
  _mm_storel_epi64(reinterpret_cast<__m128i*>(codes), _mm_packus_epi16(w, w));
}

// Magnitudes of one row into mag[0 .. width) and codes into codes[0 .. width).
// squaredLimit: squaredLowLimit<R>(low), used by the L2 norm only.
template <LowRule R, Norm N>
void magnitudeRow(const Zel16s* dx, const Zel16s* dy, int width, float low, int32_t squaredLimit, float* mag,
                  uint8_t* codes) {
  const __m128 lowV = _mm_set1_ps(low);
  const __m128i limitV = _mm_set1_epi32(squaredLimit);
  auto block = [&](int x) {
    __m128i a = IntVec::loadu(dx + x);
    __m128i b = IntVec::loadu(dy + x);
    __m128i sq0 = _mm_setzero_si128(), sq1 = _mm_setzero_si128();
    if (N == Norm::kL2) {
      const __m128i p0 = _mm_unpacklo_epi16(a, b), p1 = _mm_unpackhi_epi16(a, b);
      sq0 = _mm_madd_epi16(p0, p0);
      sq1 = _mm_madd_epi16(p1, p1);
      // Most of a picture lies below the low threshold: no roots there.
      if (_mm_movemask_epi8(_mm_or_si128(_mm_cmpgt_epi32(sq0, limitV), _mm_cmpgt_epi32(sq1, limitV))) == 0) {
        FloatVec::storeu(mag + x, _mm_setzero_ps());
        FloatVec::storeu(mag + x + 4, _mm_setzero_ps());
        _mm_storel_epi64(reinterpret_cast<__m128i*>(codes + x), _mm_set1_epi8(char(kNone)));
        return;
      }
    }
    __m128i alo = _mm_srai_epi32(_mm_unpacklo_epi16(a, a), 16);
    __m128i ahi = _mm_srai_epi32(_mm_unpackhi_epi16(a, a), 16);
    __m128i blo = _mm_srai_epi32(_mm_unpacklo_epi16(b, b), 16);
    __m128i bhi = _mm_srai_epi32(_mm_unpackhi_epi16(b, b), 16);
    __m128i c0 = finishLanes<R>(lanesFromInt32<N>(alo, blo, sq0), lowV, mag + x);
    __m128i c1 = finishLanes<R>(lanesFromInt32<N>(ahi, bhi, sq1), lowV, mag + x + 4);
    storeCodes8(codes + x, c0, c1);
  };
  if (width >= 8) {
    // The last block may overlap the previous one; it rewrites equal values.
    for (int x = 0; x < width; x += 8) block(x + 8 <= width ? x : width - 8);
    return;
  }
  for (int x = 0; x < width; ++x) mag[x] = pixelMagnitude<R, N>(dx[x], dy[x], low, codes + x);
}

template <LowRule R, Norm N>
void magnitudeRow(const Zel32f* dx, const Zel32f* dy, int width, float low, int32_t /*squaredLimit*/, float* mag,
                  uint8_t* codes) {
  const __m128 lowV = _mm_set1_ps(low);
  auto block = [&](int x) {
    __m128i c0 = finishLanes<R>(lanesFromFloat(FloatVec::loadu(dx + x), FloatVec::loadu(dy + x)), lowV, mag + x);
    __m128i c1 =
        finishLanes<R>(lanesFromFloat(FloatVec::loadu(dx + x + 4), FloatVec::loadu(dy + x + 4)), lowV, mag + x + 4);
    storeCodes8(codes + x, c0, c1);
  };
  if (width >= 8) {
    for (int x = 0; x < width; x += 8) block(x + 8 <= width ? x : width - 8);
    return;
  }
  for (int x = 0; x < width; ++x) mag[x] = pixelMagnitude<R, N>(dx[x], dy[x], low, codes + x);
}

// ---- Thinning --------------------------------------------------------------

// Whether the pixel at cur[1] (magnitude m, code c) is a local maximum; up,
// cur and down point one pixel left of it in the three magnitude rows.
// Strict towards up and left, non-strict towards down and right, so that the
// first pixel of a plateau across the edge survives.
inline bool localMaximum(uint8_t code, const float* up, const float* cur, const float* down) {
  const float m = cur[1];
  switch (code) {
    case kHorizontal: return cur[0] < m && cur[2] <= m;
    case kVertical: return up[1] < m && down[1] <= m;
    case kDiagonalSame: return down[2] < m && up[0] < m;
    case kDiagonalOpposite: return down[0] < m && up[2] < m;
    default: return false;
  }
}

// Local maxima of four pixels as an all-ones lane mask.
inline __m128 localMaxima4(__m128i code, const float* up, const float* cur, const float* down) {
  const __m128 m = FloatVec::loadu(cur + 1);
  const __m128 h = _mm_and_ps(_mm_cmplt_ps(FloatVec::loadu(cur), m), _mm_cmple_ps(FloatVec::loadu(cur + 2), m));
  const __m128 v = _mm_and_ps(_mm_cmplt_ps(FloatVec::loadu(up + 1), m), _mm_cmple_ps(FloatVec::loadu(down + 1), m));
  const __m128 d1 = _mm_and_ps(_mm_cmplt_ps(FloatVec::loadu(down + 2), m), _mm_cmplt_ps(FloatVec::loadu(up), m));
  const __m128 d2 = _mm_and_ps(_mm_cmplt_ps(FloatVec::loadu(down), m), _mm_cmplt_ps(FloatVec::loadu(up + 2), m));
  auto is = [&](int k) { return _mm_castsi128_ps(_mm_cmpeq_epi32(code, _mm_set1_epi32(k))); };
  __m128 r = _mm_and_ps(is(kHorizontal), h);
  r = _mm_or_ps(r, _mm_and_ps(is(kVertical), v));
  r = _mm_or_ps(r, _mm_and_ps(is(kDiagonalSame), d1));
  return _mm_or_ps(r, _mm_and_ps(is(kDiagonalOpposite), d2));
}

// Thins image row y: up, cur and down are the magnitude rows with their left
// zero at index 0. Marks candidates in mapRow (first pixel at index 0); a
// candidate above `high` becomes an edge in dstRow at once and is pushed.
template <typename Push>
void thinRow(const float* up, const float* cur, const float* down, const uint8_t* codes, int width,
             float high, uint8_t* mapRow, uint8_t* dstRow, int y, Push&& push) {
  const __m128 highV = _mm_set1_ps(high);
  const __m128i none = _mm_set1_epi8(char(kNone));
  const __m128i zero = _mm_setzero_si128();
  auto strongBits = [&](int x, __m128 maxima) {
    int bits = _mm_movemask_ps(_mm_and_ps(maxima, _mm_cmpgt_ps(FloatVec::loadu(cur + x + 1), highV)));
    for (; bits; bits &= bits - 1) {
      const int i = x + __builtin_ctz(unsigned(bits));
      dstRow[i] = kEdge;
      push(y, i);
    }
  };
  int x = 0;
  for (; x + 16 <= width; x += 16) {
    const __m128i c = IntVec::loadu(codes + x);
    if (_mm_movemask_epi8(_mm_cmpeq_epi8(c, none)) == 0xFFFF) continue;
    const __m128i c16lo = _mm_unpacklo_epi8(c, zero), c16hi = _mm_unpackhi_epi8(c, zero);
    const __m128i lanes[4] = {_mm_unpacklo_epi16(c16lo, zero), _mm_unpackhi_epi16(c16lo, zero),
                              _mm_unpacklo_epi16(c16hi, zero), _mm_unpackhi_epi16(c16hi, zero)};
    __m128i masks[4];
    for (int k = 0; k < 4; ++k) {
      const int xk = x + 4 * k;
      const __m128 maxima = localMaxima4(lanes[k], up + xk, cur + xk, down + xk);
      masks[k] = _mm_castps_si128(maxima);
      strongBits(xk, maxima);
    }
    const __m128i bytes = _mm_packs_epi16(_mm_packs_epi32(masks[0], masks[1]), _mm_packs_epi32(masks[2], masks[3]));
    IntVec::storeu(mapRow + x,
                     _mm_and_si128(bytes, _mm_set1_epi8(char(kCandidate))));
  }
  for (; x < width; ++x) {
    if (codes[x] == kNone || !localMaximum(codes[x], up + x, cur + x, down + x)) continue;
    mapRow[x] = kCandidate;
    if (cur[x + 1] > high) {
      dstRow[x] = kEdge;
      push(y, x);
    }
  }
}

// ---- Hysteresis ------------------------------------------------------------

// Stack entries: 16-bit coordinate pairs while both sides are below 65533,
// 32-bit pairs beyond, or one 32-bit offset into the framed map where the
// buffer only has room for four bytes an entry.
struct Pair16 {
  uint16_t row, col;
  static Pair16 make(int r, int c, int) { return {uint16_t(r), uint16_t(c)}; }
  void get(int* r, int* c, int) const { *r = row, *c = col; }
};
struct Pair32 {
  int32_t row, col;
  static Pair32 make(int r, int c, int) { return {r, c}; }
  void get(int* r, int* c, int) const { *r = row, *c = col; }
};
struct MapOffset32 {
  uint32_t offset;
  static MapOffset32 make(int r, int c, int mapStride) {
    return {uint32_t(r + 1) * uint32_t(mapStride) + uint32_t(c + 1)};
  }
  void get(int* r, int* c, int mapStride) const {
    *r = int(offset / uint32_t(mapStride)) - 1;
    *c = int(offset % uint32_t(mapStride)) - 1;
  }
};

// Grows edges from the stacked pixels through candidates, 8-connected, in the
// neighbour order up-left, up, up-right, left, right, down-left, down,
// down-right. The map's zero frame stops the growth at the image edges.
template <typename Entry>
void hysteresis(Entry* stack, Entry* top, const uint8_t* map, int mapStride, uint8_t* dst, ptrdiff_t dstStep) {
  while (top != stack) {
    int r, c;
    (--top)->get(&r, &c, mapStride);
    const uint8_t* m = map + ptrdiff_t(r + 1) * mapStride + (c + 1);
    uint8_t* d = dst + ptrdiff_t(r) * dstStep + c;
    auto visit = [&](int dr, int dc) {
      if (m[ptrdiff_t(dr) * mapStride + dc] == kCandidate) {
        uint8_t* p = d + ptrdiff_t(dr) * dstStep + dc;
        if (*p == 0) {
          *p = kEdge;
          *top++ = Entry::make(r + dr, c + dc, mapStride);
        }
      }
    };
    visit(-1, -1);
    visit(-1, 0);
    visit(-1, 1);
    visit(0, -1);
    visit(0, 1);
    visit(1, -1);
    visit(1, 0);
    visit(1, 1);
  }
}

}  // namespace canny
}  // namespace zelcv

#endif  // ZELCV_FEATURES_CANNY_KERNELS_H
