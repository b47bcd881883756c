// Run-based connected regions, shared by marker labelling and speckle
// marking. A row is cut into runs (maximal horizontal stretches of pixels
// that join), each run is linked to the runs of the row above that it
// touches, and a union-find forest over the runs gives the regions. Runs are
// numbered in raster order and a union always keeps the smaller root, so
// every run's parent has a smaller number and the root of a region is its
// first run: one forward pass resolves every run's region.
#ifndef ZELCV_SEGMENT_LABEL_RUNS_H
#define ZELCV_SEGMENT_LABEL_RUNS_H

#include <emmintrin.h>
#include <stdint.h>

#include "core/sizes.h"

namespace zelcv {
namespace runs {

struct Run {
  int32_t x0, x1;  // first and last column
  int32_t parent;  // union-find parent; after resolve, a region value
};

// The work buffer: row starts (h + 1 run numbers) and up to w x h runs.
inline SizeCalc bufferBytes(int w, int h) {
  return SizeCalc(12) * SizeCalc(w) * SizeCalc(h) + SizeCalc(4) * (SizeCalc(h) + SizeCalc(1)) + SizeCalc(64);
}

struct Layout {
  int32_t* rowStart;
  Run* runs;
};

inline Layout place(uint8_t* buffer, int h) {
  uint8_t* p = reinterpret_cast<uint8_t*>((reinterpret_cast<uintptr_t>(buffer) + 15) & ~uintptr_t(15));
  Layout l;
  l.rowStart = reinterpret_cast<int32_t*>(p);
  l.runs = reinterpret_cast<Run*>(p + ((int64_t(h) + 1) * 4 + 15) / 16 * 16);
  return l;
}

inline int32_t findRoot(Run* r, int32_t i) {
  while (r[i].parent != i) {
    r[i].parent = r[r[i].parent].parent;  // path halving keeps parent <= index
    i = r[i].parent;
  }
  return i;
}

inline void unite(Run* r, int32_t a, int32_t b) {
  a = findRoot(r, a);
  b = findRoot(r, b);
  if (a < b)
    r[b].parent = a;
  else if (b < a)
    r[a].parent = b;
}

inline int lowestSetBit(unsigned v) { return __builtin_ctz(v); }

// Scanners over one row. kVector selects the SSE2 form; both return the same
// columns. firstOther: the first column >= x whose value is not v (w if
// none).
template <typename T, bool kVector>
struct Scan;

template <bool kVector>
struct Scan<uint8_t, kVector> {
  static int firstOther(const uint8_t* s, int x, int w, uint8_t v) {
    if (kVector) {
      const __m128i vv = _mm_set1_epi8(static_cast<char>(v));
      for (; x + 16 <= w; x += 16) {
        const unsigned eq = unsigned(_mm_movemask_epi8(
            _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(s + x)), vv)));
        if (eq != 0xFFFFu) return x + lowestSetBit(~eq & 0xFFFFu);
      }
    }
    while (x < w && s[x] == v) ++x;
    return x;
  }
};

template <bool kVector>
struct Scan<uint16_t, kVector> {
  static int firstOther(const uint16_t* s, int x, int w, uint16_t v) {
    if (kVector) {
      const __m128i vv = _mm_set1_epi16(static_cast<short>(v));
      for (; x + 8 <= w; x += 8) {
        __m128i a;
        __builtin_memcpy(&a, s + x, 16);  // 16u rows may sit at odd addresses
        const unsigned eq = unsigned(_mm_movemask_epi8(_mm_cmpeq_epi16(a, vv)));
        if (eq != 0xFFFFu) return x + lowestSetBit(~eq & 0xFFFFu) / 2;
      }
    }
    while (x < w && s[x] == v) ++x;
    return x;
  }
};

}  // namespace runs
}  // namespace zelcv

#endif  // ZELCV_SEGMENT_LABEL_RUNS_H
