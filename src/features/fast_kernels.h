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
// difference) - 1.
inline int score(const Circle& c, const Zel8u* centre, int /*step*/, int arc) {
  const int v = *centre;
  int d[16];
  for (int k = 0; k < c.n; ++k) d[k] = centre[c.offset[k]] - v;
  int best = INT32_MIN;
  for (int s = 0; s < c.n; ++s) {
    int lo = INT32_MAX, hi = INT32_MIN;  // smallest p - v, largest p - v on the arc
    for (int i = 0; i < arc; ++i) {
      const int e = d[(s + i) % c.n];
      lo = e < lo ? e : lo;
      hi = e > hi ? e : hi;
    }
    best = lo > best ? lo : best;
    best = -hi > best ? -hi : best;
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
  // Compass pixels: a corner has two of them on its arc.
  const int q = c.n / 4;
  __m128i nb = zero, nd = zero;
  for (int k = 0; k < c.n; k += q) {
    nb = _mm_sub_epi8(nb, brighter(k));
    nd = _mm_sub_epi8(nd, darker(k));
  }
  const __m128i one = _mm_set1_epi8(1);
  const __m128i maybe = _mm_or_si128(_mm_cmpgt_epi8(nb, one), _mm_cmpgt_epi8(nd, one));
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
