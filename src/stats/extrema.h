// The smallest and largest selected value and the first location of each in
// raster order (smallest row, then smallest column). Each row's extrema come
// from a vector pass; only a row that improves on the extrema so far is
// scanned again for the column. 32f NaNs are never selected: they compare
// neither below nor above anything, in the vector pass as in the scan.
#ifndef ZELCV_STATS_EXTREMA_H
#define ZELCV_STATS_EXTREMA_H

#include <emmintrin.h>

#include "stats/reduce.h"

namespace zelcv {
namespace stats {

template <typename T>
struct Extrema {
  T min = T(0), max = T(0);
  int minX = -1, minY = -1, maxX = -1, maxY = -1;  // -1: no pixel selected
};

template <typename T>
struct Limits {
  static constexpr T lowest() { return std::numeric_limits<T>::min(); }
  static constexpr T highest() { return std::numeric_limits<T>::max(); }
};
template <>
struct Limits<float> {
  static constexpr float lowest() { return -std::numeric_limits<float>::infinity(); }
  static constexpr float highest() { return std::numeric_limits<float>::infinity(); }
};

// Extrema of the selected values of columns [x0, w): lo starts at the
// highest value and hi at the lowest, so a row without selected values
// leaves them there.
template <bool kMask, typename T>
inline void scalarExtrema(const T* a, const uint8_t* m, int x0, int w, int stride, T& lo, T& hi) {
  for (int x = x0; x < w; ++x) {
    if (kMask && !m[x]) continue;
    const T v = a[ptrdiff_t(x) * stride];
    if (v < lo) lo = v;
    if (v > hi) hi = v;
  }
}

template <bool kMask, typename T>
struct VectorExtrema {
  static int run(const T*, const uint8_t*, int, T&, T&) { return 0; }
};

// Unselected bytes become 255 for the minimum and 0 for the maximum.
template <bool kMask>
struct VectorExtrema<kMask, uint8_t> {
  static int run(const uint8_t* a, const uint8_t* m, int w, uint8_t& lo, uint8_t& hi) {
    const int end = w & ~15;
    if (end == 0) return 0;
    const __m128i zero = _mm_setzero_si128();
    __m128i vlo = _mm_set1_epi8(char(lo)), vhi = _mm_set1_epi8(char(hi));
    for (int x = 0; x < end; x += 16) {
      const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(a + x));
      if (kMask) {
        const __m128i off = _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(m + x)), zero);
        vlo = _mm_min_epu8(vlo, _mm_or_si128(v, off));
        vhi = _mm_max_epu8(vhi, _mm_andnot_si128(off, v));
      } else {
        vlo = _mm_min_epu8(vlo, v);
        vhi = _mm_max_epu8(vhi, v);
      }
    }
    lo = minByte(vlo);
    hi = maxByte(vhi);
    return end;
  }
};

// Unselected values become +inf for the minimum and -inf for the maximum;
// the running value is the second operand, which min/max keep when the
// first is a NaN.
template <bool kMask>
struct VectorExtrema<kMask, float> {
  static int run(const float* a, const uint8_t* m, int w, float& lo, float& hi) {
    const int end = w & ~3;
    if (end == 0) return 0;
    const __m128i zero = _mm_setzero_si128();
    const __m128 inf = _mm_set1_ps(Limits<float>::highest()), ninf = _mm_set1_ps(Limits<float>::lowest());
    __m128 vlo = _mm_set1_ps(lo), vhi = _mm_set1_ps(hi);
    for (int x = 0; x < end; x += 4) {
      const __m128 v = _mm_loadu_ps(a + x);
      if (kMask) {
        int32_t bytes;
        __builtin_memcpy(&bytes, m + x, 4);
        __m128i off = _mm_cmpeq_epi8(_mm_cvtsi32_si128(bytes), zero);
        off = _mm_unpacklo_epi8(off, off);
        const __m128 offf = _mm_castsi128_ps(_mm_unpacklo_epi16(off, off));
        vlo = _mm_min_ps(_mm_or_ps(_mm_and_ps(offf, inf), _mm_andnot_ps(offf, v)), vlo);
        vhi = _mm_max_ps(_mm_or_ps(_mm_and_ps(offf, ninf), _mm_andnot_ps(offf, v)), vhi);
      } else {
        vlo = _mm_min_ps(v, vlo);
        vhi = _mm_max_ps(v, vhi);
      }
    }
    alignas(16) float l[4], h[4];
    _mm_store_ps(l, vlo);
    _mm_store_ps(h, vhi);
    for (int i = 0; i < 4; ++i) {
      if (l[i] < lo) lo = l[i];
      if (h[i] > hi) hi = h[i];
    }
    return end;
  }
};

// The first selected column of the row whose value equals v, or -1.
template <bool kMask, typename T>
inline int firstEqual(const T* a, const uint8_t* m, int w, int stride, T v) {
  for (int x = 0; x < w; ++x)
    if ((!kMask || m[x]) && a[ptrdiff_t(x) * stride] == v) return x;
  return -1;
}

template <bool kMask, typename T>
void extrema(const Source<T>& s, Extrema<T>& e) {
  for (int y = 0; y < s.height; ++y) {
    const T* a = s.rowA(y);
    const uint8_t* m = kMask ? s.rowMask(y) : nullptr;
    T lo = Limits<T>::highest(), hi = Limits<T>::lowest();
    int x = s.stride == 1 ? VectorExtrema<kMask, T>::run(a, m, s.width, lo, hi) : 0;
    scalarExtrema<kMask>(a, m, x, s.width, s.stride, lo, hi);
    if (e.minX < 0 || lo < e.min) {
      const int at = firstEqual<kMask>(a, m, s.width, s.stride, lo);
      if (at >= 0) {
        e.min = a[ptrdiff_t(at) * s.stride];
        e.minX = at;
        e.minY = y;
      }
    }
    if (e.maxX < 0 || hi > e.max) {
      const int at = firstEqual<kMask>(a, m, s.width, s.stride, hi);
      if (at >= 0) {
        e.max = a[ptrdiff_t(at) * s.stride];
        e.maxX = at;
        e.maxY = y;
      }
    }
    // Nothing later can come first.
    if (e.minX >= 0 && e.maxX >= 0 && e.min == Limits<T>::lowest() && e.max == Limits<T>::highest()) break;
  }
}

}  // namespace stats
}  // namespace zelcv

#endif  // ZELCV_STATS_EXTREMA_H
