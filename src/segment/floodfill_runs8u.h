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

// Lanes below n set (n from 0 to 16).
inline __m128i firstLanes(int n) {
  const __m128i index = _mm_setr_epi8(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15);
  return _mm_cmplt_epi8(index, _mm_set1_epi8(char(n)));
}
// Lanes from 16 - n up set.
inline __m128i lastLanes(int n) {
  const __m128i index = _mm_setr_epi8(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15);
  return _mm_cmpgt_epi8(index, _mm_set1_epi8(char(15 - n)));
}
// v with the lanes of `sel` replaced by `with`.
inline __m128i blend(__m128i v, __m128i with, __m128i sel) {
  return _mm_or_si128(_mm_and_si128(sel, with), _mm_andnot_si128(sel, v));
}

// Writes n bytes of value v without a library call (the spans are short).
inline void fillBytes(uint8_t* p, int n, uint8_t v) {
  if (n >= 16) {
    const __m128i vv = _mm_set1_epi8(char(v));
    for (int i = 0; i + 16 <= n; i += 16) store16(p + i, vv);
    store16(p + n - 16, vv);
    return;
  }
  if (n >= 8) {
    const uint64_t w = 0x0101010101010101ull * v;
    memcpy(p, &w, 8);
    memcpy(p + n - 8, &w, 8);
    return;
  }
  if (n >= 4) {
    const uint32_t w = 0x01010101u * v;
    memcpy(p, &w, 4);
    memcpy(p + n - 4, &w, 4);
    return;
  }
  for (int i = 0; i < n; ++i) p[i] = v;
}

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
      const __m128i v = load16(r + x + 1);
      const unsigned m = passes(v);
      if (m != 0xFFFF) {
        const int n = lowestSet(~m);
        store16(r + x + 1, blend(v, nvV, firstLanes(n)));
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
      const __m128i v = load16(r + x - 16);
      const unsigned m = passes(v);
      if (m != 0xFFFF) {
        const int n = 15 - highestSet(~m & 0xFFFFu);
        store16(r + x - 16, blend(v, nvV, lastLanes(n)));
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

  // Sixteen candidates against the span pixels beside them (and, with
  // 8-connectivity, diagonal to them) where all of those lie in the span;
  // one at a time elsewhere.
  template <class Row>
  int nextJoin(const Row& r, int x, int to, const Row& s, int left, int right) const {
    const Derived& d = static_cast<const Derived&>(*this);
    constexpr bool kConn8 = Derived::kConn8;
    const int last = d.width - 1;
    while (x <= to) {
      const bool block = kConn8 ? (x - 1 >= left && x + 16 <= right && x + 15 <= to) : x + 15 <= to;
      if (block) {
        const __m128i seen = load16(r.seen + x), q = load16(r.px + x);
        unsigned m = passes(q, load16(s.px + x), seen);
        if (kConn8) m |= passes(q, load16(s.px + x - 1), seen) | passes(q, load16(s.px + x + 1), seen);
        if (m) return x + lowestSet(m);
        x += 16;
        continue;
      }
      // A short stretch (most spans of a rough picture): one block whose
      // lanes outside x .. to, and tests against pixels outside the span,
      // are masked off, while its loads stay inside the rows.
      if (x >= 1 && x + 16 <= last) {
        const __m128i seen = load16(r.seen + x), q = load16(r.px + x);
        // Lanes i with lo <= x + i <= hi.
        auto lanes = [x](int lo, int hi) {
          const int a = lo - x < 0 ? 0 : lo - x, b = hi - x > 15 ? 15 : hi - x;
          return a > b ? 0u : ((2u << b) - 1u) & ~((1u << a) - 1u);
        };
        const unsigned wanted = lanes(x, to);
        unsigned m = passes(q, load16(s.px + x), seen) & lanes(left, right);
        if (kConn8)
          m |= (passes(q, load16(s.px + x - 1), seen) & lanes(left + 1, right + 1)) |
               (passes(q, load16(s.px + x + 1), seen) & lanes(left - 1, right - 1));
        m &= wanted;
        if (m) return x + lowestSet(m);
        x += 16;
        continue;
      }
      if (d.joinsFromSpan(r, x, s, left, right)) return x;
      ++x;
    }
    return x;
  }
  template <class Row>
  int extendRight(const Row& r, int x) const {
    const Derived& d = static_cast<const Derived&>(*this);
    const int last = d.width - 1;
    // Most runs of a rough picture are short: try one pixel first.
    if (x == last || !d.joinsFromRun(r, x + 1, x)) return x;
    while (x + 16 <= last) {
      const __m128i seen = load16(r.seen + x + 1);
      const unsigned m = passes(load16(r.px + x + 1), load16(r.px + x), seen);
      if (m != 0xFFFF) {
        const int n = lowestSet(~m);
        store16(r.seen + x + 1, _mm_or_si128(seen, _mm_and_si128(firstLanes(n), _mm_set1_epi8(1))));
        return x + n;
      }
      store16(r.seen + x + 1, _mm_set1_epi8(1));
      x += 16;
    }
    while (x < last && d.joinsFromRun(r, x + 1, x)) d.take(r, ++x);
    return x;
  }
  template <class Row>
  int extendRightBeside(const Row& r, int x, const Row& s, int left, int right) const {
    const Derived& d = static_cast<const Derived&>(*this);
    constexpr bool kConn8 = Derived::kConn8;
    const int last = d.width - 1;
    const int reach = right + (kConn8 ? 1 : 0);
    while (x < last) {
      if (x + 1 > reach) return extendRight(r, x);
      // Lanes x + 1 .. x + 16, each with its span pixels inside the span.
      const bool block = x + 16 <= last && (kConn8 ? (x >= left && x + 17 <= right) : x + 16 <= right);
      if (block) {
        const __m128i seen = load16(r.seen + x + 1), q = load16(r.px + x + 1);
        unsigned m = passes(q, load16(r.px + x), seen) | passes(q, load16(s.px + x + 1), seen);
        if (kConn8) m |= passes(q, load16(s.px + x), seen) | passes(q, load16(s.px + x + 2), seen);
        if (m != 0xFFFF) {
          const int n = lowestSet(~m);
          store16(r.seen + x + 1, _mm_or_si128(seen, _mm_and_si128(firstLanes(n), _mm_set1_epi8(1))));
          return x + n;
        }
        store16(r.seen + x + 1, _mm_set1_epi8(1));
        x += 16;
        continue;
      }
      if (!d.joinsFromRun(r, x + 1, x) && !d.joinsFromSpan(r, x + 1, s, left, right)) return x;
      d.take(r, ++x);
    }
    return x;
  }
  template <class Row>
  int extendLeft(const Row& r, int x) const {
    const Derived& d = static_cast<const Derived&>(*this);
    if (x == 0 || !d.joinsFromRun(r, x - 1, x)) return x;
    while (x >= 16) {
      const __m128i seen = load16(r.seen + x - 16);
      const unsigned m = passes(load16(r.px + x - 16), load16(r.px + x - 15), seen);
      if (m != 0xFFFF) {
        const int n = 15 - highestSet(~m & 0xFFFFu);
        store16(r.seen + x - 16, _mm_or_si128(seen, _mm_and_si128(lastLanes(n), _mm_set1_epi8(1))));
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
