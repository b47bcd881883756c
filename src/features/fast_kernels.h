// The FAST corner test and score, for one centre and for sixteen.
#ifndef ZELCV_FEATURES_FAST_KERNELS_H
#define ZELCV_FEATURES_FAST_KERNELS_H

#include <emmintrin.h>
#include <stddef.h>
#include <stdint.h>

#include "zelcv.h"

namespace zelcv {
namespace fast {

// The discrete circle in cyclic order, from the top, clockwise; offsets as
// (dx, dy) and as byte offsets for the caller's step.
struct Circle {
  int radius;
  int n;
  ptrdiff_t offset[16];
};

inline const int* circleTable(int radius) {
  static const int k3[32] = {0, -3, 1, -3, 2, -2, 3, -1, 3, 0, 3, 1, 2, 2, 1, 3,
                             0, 3, -1, 3, -2, 2, -3, 1, -3, 0, -3, -1, -2, -2, -1, -3};
  static const int k2[24] = {0, -2, 1, -2, 2, -1, 2, 0, 2, 1, 1, 2, 0, 2, -1, 2, -2, 1, -2, 0, -2, -1, -1, -2};
  static const int k1[16] = {0, -1, 1, -1, 1, 0, 1, 1, 0, 1, -1, 1, -1, 0, -1, -1};
  return radius == 3 ? k3 : radius == 2 ? k2 : k1;
}

inline Circle makeCircle(int radius, int step) {
  Circle c{radius, 4 * radius + 4, {}};
  const int* t = circleTable(radius);
  for (int k = 0; k < c.n; ++k) c.offset[k] = ptrdiff_t(t[2 * k + 1]) * step + t[2 * k];
  return c;
}

// The longest cyclic run of set flags, counted up to n + arc - 1 steps.
inline bool hasArc(const bool* flags, int n, int arc) {
  int run = 0;
  for (int k = 0; k < n + arc - 1; ++k) {
    run = flags[k % n] ? run + 1 : 0;
    if (run >= arc) return true;
  }
  return false;
}

inline bool isCorner(const Circle& c, const Zel8u* centre, int /*step*/, int threshold, int arc) {
  const int v = *centre;
  bool bright[16], dark[16];
  for (int k = 0; k < c.n; ++k) {
    const int p = centre[c.offset[k]];
    bright[k] = p > v + threshold;
    dark[k] = p < v - threshold;
  }
  return hasArc(bright, c.n, arc) || hasArc(dark, c.n, arc);
}

// (the largest, over both kinds and every arc, of the arc's smallest
// difference) - 1. The smallest (largest) difference of every arc comes from
// runs doubled in length: runs of 2, 4, ... up to the largest power of two p
// <= arc, and an arc is two overlapping runs of p.
inline int score(const Circle& c, const Zel8u* centre, int /*step*/, int arc) {
  const int v = *centre, n = c.n;
  int lo[32], hi[32];  // cyclic runs, doubled in place; 2n entries
  for (int k = 0; k < n; ++k) lo[k] = hi[k] = lo[k + n] = hi[k + n] = centre[c.offset[k]] - v;
  int p = 1;
  for (; 2 * p <= arc; p *= 2)
    for (int k = 0; k + p < 2 * n; ++k) {
      lo[k] = lo[k] < lo[k + p] ? lo[k] : lo[k + p];
      hi[k] = hi[k] > hi[k + p] ? hi[k] : hi[k + p];
    }
  int best = INT32_MIN;
  for (int k = 0; k < n; ++k) {
    const int a = lo[k] < lo[k + arc - p] ? lo[k] : lo[k + arc - p];
    const int b = hi[k] > hi[k + arc - p] ? hi[k] : hi[k + arc - p];
    best = a > best ? a : best;
    best = -b > best ? -b : best;
  }
  return best - 1;
}

// Bit i set: centre + i is a corner (i = 0 .. 15).
inline int corners16(const Circle& c, const Zel8u* centre, int /*step*/, int threshold, int arc) {
  const __m128i zero = _mm_setzero_si128();
  const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(centre));
  const __m128i t = _mm_set1_epi8(char(threshold));
  const __m128i hiLimit = _mm_adds_epu8(v, t), loLimit = _mm_subs_epu8(v, t);
  auto brighter = [&](int k) {
    const __m128i p = _mm_loadu_si128(reinterpret_cast<const __m128i*>(centre + c.offset[k]));
    return _mm_xor_si128(_mm_cmpeq_epi8(_mm_subs_epu8(p, hiLimit), zero), _mm_set1_epi8(-1));
  };
  auto darker = [&](int k) {
    const __m128i p = _mm_loadu_si128(reinterpret_cast<const __m128i*>(centre + c.offset[k]));
    return _mm_xor_si128(_mm_cmpeq_epi8(_mm_subs_epu8(loLimit, p), zero), _mm_set1_epi8(-1));
  };
  // Compass pixels: an arc longer than half the circle covers two
  // neighbouring ones.
  const int q = c.n / 4;
  const __m128i b0 = brighter(0), b1 = brighter(q), b2 = brighter(2 * q), b3 = brighter(3 * q);
  const __m128i d0 = darker(0), d1 = darker(q), d2 = darker(2 * q), d3 = darker(3 * q);
  const __m128i maybe = _mm_or_si128(
      _mm_or_si128(_mm_and_si128(b0, b1), _mm_and_si128(b2, b3)),
      _mm_or_si128(_mm_or_si128(_mm_and_si128(b1, b2), _mm_and_si128(b3, b0)),
                   _mm_or_si128(_mm_or_si128(_mm_and_si128(d0, d1), _mm_and_si128(d2, d3)),
                                _mm_or_si128(_mm_and_si128(d1, d2), _mm_and_si128(d3, d0)))));
  if (!_mm_movemask_epi8(maybe)) return 0;
  __m128i mb[16], md[16];
  for (int k = 0; k < c.n; ++k) {
    mb[k] = brighter(k);
    md[k] = darker(k);
  }
  __m128i runB = zero, runD = zero, bestB = zero, bestD = zero;
  for (int k = 0; k < c.n + arc - 1; ++k) {
    const int j = k < c.n ? k : k - c.n;
    runB = _mm_and_si128(_mm_sub_epi8(runB, mb[j]), mb[j]);
    runD = _mm_and_si128(_mm_sub_epi8(runD, md[j]), md[j]);
    bestB = _mm_max_epu8(bestB, runB);
    bestD = _mm_max_epu8(bestD, runD);
  }
  const __m128i need = _mm_set1_epi8(char(arc - 1));
  const __m128i corner = _mm_or_si128(_mm_cmpgt_epi8(bestB, need), _mm_cmpgt_epi8(bestD, need));
  return _mm_movemask_epi8(_mm_and_si128(corner, maybe));
}

}  // namespace fast
}  // namespace zelcv

#endif  // ZELCV_FEATURES_FAST_KERNELS_H
