// The FAST corner test and score, for one centre and for a row of them.
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

// Internal linkage from here: the SSE2 and the AVX2 file each keep their own
// copy, compiled for their instruction set.
namespace {

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

// Vector operations on 16 pixels; the AVX2 file has the same for 32.
struct Lanes16 {
  using R = __m128i;
  static constexpr int kWidth = 16;
  static R load(const Zel8u* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
  static R set1(int v) { return _mm_set1_epi8(char(v)); }
  static R zero() { return _mm_setzero_si128(); }
  static R adds(R a, R b) { return _mm_adds_epu8(a, b); }
  static R subs(R a, R b) { return _mm_subs_epu8(a, b); }
  static R min(R a, R b) { return _mm_min_epu8(a, b); }
  static R max(R a, R b) { return _mm_max_epu8(a, b); }
  static R eq(R a, R b) { return _mm_cmpeq_epi8(a, b); }
  static R sub(R a, R b) { return _mm_sub_epi8(a, b); }
  static R andNot(R a, R b) { return _mm_andnot_si128(a, b); }
  static uint32_t nonZeroBits(R a) { return uint32_t(_mm_movemask_epi8(_mm_cmpeq_epi8(a, zero()))) ^ 0xFFFFu; }
};

// Bit i set: centre + i is a corner (i = 0 .. V::kWidth - 1).
template <class V>
inline uint32_t cornerBits(const Circle& c, const Zel8u* centre, int threshold, int arc) {
  using R = typename V::R;
  const R zero = V::zero(), v = V::load(centre), t = V::set1(threshold);
  const R hiLimit = V::adds(v, t), loLimit = V::subs(v, t);
  // Non-zero where the pixel is brighter (darker) than the limit.
  auto above = [&](int k) { return V::subs(V::load(centre + c.offset[k]), hiLimit); };
  auto below = [&](int k) { return V::subs(loLimit, V::load(centre + c.offset[k])); };
  // An arc longer than half the circle covers one of two opposite pixels,
  const int q = c.n / 4;
  const R b0 = above(0), b2 = above(2 * q), d0 = below(0), d2 = below(2 * q);
  if (!V::nonZeroBits(V::max(V::max(b0, b2), V::max(d0, d2)))) return 0;
  // and two neighbouring compass pixels.
  const R b1 = above(q), b3 = above(3 * q);
  const R d1 = below(q), d3 = below(3 * q);
  const R maybeB = V::max(V::max(V::min(b0, b1), V::min(b1, b2)), V::max(V::min(b2, b3), V::min(b3, b0)));
  const R maybeD = V::max(V::max(V::min(d0, d1), V::min(d1, d2)), V::max(V::min(d2, d3), V::min(d3, d0)));
  const uint32_t maybe = V::nonZeroBits(V::max(maybeB, maybeD));
  if (!maybe) return 0;
  // Run lengths of brighter and darker pixels around the circle and once
  // more up to arc - 1 pixels; a run grows by one (subtracting all-ones)
  // where the pixel qualifies and restarts at 0 where it does not.
  const R ones = V::eq(zero, zero);
  R runB = zero, runD = zero, best = zero;
  for (int k = 0; k < c.n + arc - 1; ++k) {
    const int j = k < c.n ? k : k - c.n;
    const R p = V::load(centre + c.offset[j]);
    runB = V::andNot(V::eq(V::subs(p, hiLimit), zero), V::sub(runB, ones));
    runD = V::andNot(V::eq(V::subs(loLimit, p), zero), V::sub(runD, ones));
    best = V::max(best, V::max(runB, runD));
  }
  return V::nonZeroBits(V::subs(best, V::set1(arc - 1))) & maybe;
}

// Raw scores of the centres x .. end - 1 of one row (score + 1 at corners),
// V::kWidth at a time; the last block may start before x, down to `begin`,
// when the row is wide enough. Advances x; returns the corners found.
template <class V>
inline int scoreSpan(const Circle& c, const Zel8u* row, int begin, int* x, int end, int threshold, int arc,
                     Zel8u* out) {
  int found = 0;
  auto emit = [&](uint32_t bits, int at) {
    while (bits) {
      const int b = __builtin_ctz(bits);
      out[at + b] = Zel8u(score(c, row + at + b, 0, arc) + 1);
      bits &= bits - 1;
      ++found;
    }
  };
  for (; *x + V::kWidth <= end; *x += V::kWidth) emit(cornerBits<V>(c, row + *x, threshold, arc), *x);
  if (*x < end && end - begin >= V::kWidth) {
    const int last = end - V::kWidth;
    emit(cornerBits<V>(c, row + last, threshold, arc) >> (*x - last), *x);
    *x = end;
  }
  return found;
}

// One row of raw scores into `out`, which holds zeros: score + 1 at corners.
// Returns the number of corners.
template <class... Wide>
inline int scoreRow(const Circle& c, const Zel8u* row, int width, int threshold, int arc, Zel8u* out) {
  const int r = c.radius;
  int x = r, found = 0;
  ((found += scoreSpan<Wide>(c, row, r, &x, width - r, threshold, arc, out)), ...);
  found += scoreSpan<Lanes16>(c, row, r, &x, width - r, threshold, arc, out);
  for (; x < width - r; ++x)
    if (isCorner(c, row + x, 0, threshold, arc)) {
      out[x] = Zel8u(score(c, row + x, 0, arc) + 1);
      ++found;
    }
  return found;
}

}  // namespace
}  // namespace fast

namespace avx2 {
// scoreRow with 32 centres at a time, the same results. In fast_avx2.cpp.
int fastScoreRow(const fast::Circle& c, const Zel8u* row, int width, int threshold, int arc, Zel8u* out);
}  // namespace avx2
}  // namespace zelcv

#endif  // ZELCV_FEATURES_FAST_KERNELS_H
