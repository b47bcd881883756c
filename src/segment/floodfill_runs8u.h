// Sixteen pixels at a time for the one-channel 8u fills: finding the next
// pixel that joins, and extending a run to either side. They give exactly the
// results of the pixel-by-pixel rules; a run ends at its first failing pixel.
#ifndef ZELCV_SEGMENT_FLOODFILL_RUNS8U_H
#define ZELCV_SEGMENT_FLOODFILL_RUNS8U_H

#include <emmintrin.h>
#include <stdint.h>
#include <string.h>

namespace zelcv {
namespace floodfill {

inline __m128i load16(const uint8_t* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
inline void store16(uint8_t* p, __m128i v) { _mm_storeu_si128(reinterpret_cast<__m128i*>(p), v); }
inline int lowestSet(unsigned m) { return __builtin_ctz(m); }
inline int highestSet(unsigned m) { return 31 - __builtin_clz(m); }

// Value-based fills (plain and range): a pixel joins when lo <= v <= hi and,
// when `guard` is set, v differs from the new value.
template <class Derived>
struct Runs8u {
  __m128i loV, hiV, nvV, guardV;
  uint8_t lo, hi, nv;
  bool guard;

  void prepare(uint8_t low, uint8_t high, uint8_t newVal, bool guardNew) {
    lo = low, hi = high, nv = newVal, guard = guardNew;
    loV = _mm_set1_epi8(char(low));
    hiV = _mm_set1_epi8(char(high));
    nvV = _mm_set1_epi8(char(newVal));
    guardV = guardNew ? _mm_set1_epi8(char(-1)) : _mm_setzero_si128();
  }
  bool one(uint8_t v) const { return lo <= v && v <= hi && !(guard && v == nv); }
  unsigned passes(__m128i v) const {
    const __m128i in = _mm_and_si128(_mm_cmpeq_epi8(_mm_max_epu8(v, loV), v),
                                     _mm_cmpeq_epi8(_mm_min_epu8(v, hiV), v));
    const __m128i filled = _mm_and_si128(_mm_cmpeq_epi8(v, nvV), guardV);
    return unsigned(_mm_movemask_epi8(_mm_andnot_si128(filled, in)));
  }
  int rowWidth() const { return static_cast<const Derived&>(*this).width; }

  int nextJoin(uint8_t* r, int x, int to, uint8_t*, int, int) const {
    for (; x + 15 <= to; x += 16)
      if (unsigned m = passes(load16(r + x))) return x + lowestSet(m);
    while (x <= to && !one(r[x])) ++x;
    return x;
  }
  int extendRight(uint8_t* r, int x) const {
    const int last = rowWidth() - 1;
    while (x + 16 <= last) {
      const unsigned m = passes(load16(r + x + 1));
      if (m != 0xFFFF) {
        const int n = lowestSet(~m);
        memset(r + x + 1, nv, size_t(n));
        return x + n;
      }
      store16(r + x + 1, nvV);
      x += 16;
    }
    while (x < last && one(r[x + 1])) r[++x] = nv;
    return x;
  }
  int extendLeft(uint8_t* r, int x) const {
    while (x >= 16) {
      const unsigned m = passes(load16(r + x - 16));
      if (m != 0xFFFF) {
        const int n = 15 - highestSet(~m & 0xFFFFu);
        memset(r + x - n, nv, size_t(n));
        return x - n;
      }
      store16(r + x - 16, nvV);
      x -= 16;
    }
    while (x > 0 && one(r[x - 1])) r[--x] = nv;
    return x;
  }
};

// Gradient fills: q joins from p when it is unmarked and the unsigned
// q + minDelta - p <= minDelta + maxDelta (at most 510, so 16-bit lanes hold
// it, a negative difference wrapping above).
template <class Derived>
struct GradRuns8u {
  __m128i minV, spanV;

  void prepare(uint8_t minDelta, uint8_t maxDelta) {
    minV = _mm_set1_epi16(short(minDelta));
    spanV = _mm_set1_epi16(short(int(minDelta) + int(maxDelta)));
  }
  unsigned passes(__m128i q, __m128i p, __m128i seen) const {
    const __m128i zero = _mm_setzero_si128();
    const __m128i dLo = _mm_sub_epi16(_mm_add_epi16(_mm_unpacklo_epi8(q, zero), minV), _mm_unpacklo_epi8(p, zero));
    const __m128i dHi = _mm_sub_epi16(_mm_add_epi16(_mm_unpackhi_epi8(q, zero), minV), _mm_unpackhi_epi8(p, zero));
    const __m128i ok = _mm_packs_epi16(_mm_cmpeq_epi16(_mm_subs_epu16(dLo, spanV), zero),
                                       _mm_cmpeq_epi16(_mm_subs_epu16(dHi, spanV), zero));
    return unsigned(_mm_movemask_epi8(_mm_and_si128(ok, _mm_cmpeq_epi8(seen, zero))));
  }

  template <class Row>
  int nextJoin(const Row& r, int x, int to, const Row& s, int left, int right) const {
    const Derived& d = static_cast<const Derived&>(*this);
    const __m128i zero = _mm_setzero_si128();
    while (x <= to) {
      // Marked pixels are skipped sixteen at a time.
      while (x + 15 <= to) {
        const unsigned m = unsigned(_mm_movemask_epi8(_mm_cmpeq_epi8(load16(r.seen + x), zero)));
        if (m) {
          x += lowestSet(m);
          break;
        }
        x += 16;
      }
      while (x <= to && r.seen[x]) ++x;
      if (x > to || d.joinsFromSpan(r, x, s, left, right)) return x;
      ++x;
    }
    return x;
  }
  template <class Row>
  int extendRight(const Row& r, int x) const {
    const Derived& d = static_cast<const Derived&>(*this);
    const int last = d.width - 1;
    while (x + 16 <= last) {
      const unsigned m = passes(load16(r.px + x + 1), load16(r.px + x), load16(r.seen + x + 1));
      if (m != 0xFFFF) {
        const int n = lowestSet(~m);
        memset(r.seen + x + 1, 1, size_t(n));
        return x + n;
      }
      store16(r.seen + x + 1, _mm_set1_epi8(1));
      x += 16;
    }
    while (x < last && d.joinsFromRun(r, x + 1, x)) d.take(r, ++x);
    return x;
  }
  template <class Row>
  int extendLeft(const Row& r, int x) const {
    const Derived& d = static_cast<const Derived&>(*this);
    while (x >= 16) {
      const unsigned m = passes(load16(r.px + x - 16), load16(r.px + x - 15), load16(r.seen + x - 16));
      if (m != 0xFFFF) {
        const int n = 15 - highestSet(~m & 0xFFFFu);
        memset(r.seen + x - n, 1, size_t(n));
        return x - n;
      }
      store16(r.seen + x - 16, _mm_set1_epi8(1));
      x -= 16;
    }
    while (x > 0 && d.joinsFromRun(r, x - 1, x)) d.take(r, --x);
    return x;
  }
};

}  // namespace floodfill
}  // namespace zelcv

#endif  // ZELCV_SEGMENT_FLOODFILL_RUNS8U_H
