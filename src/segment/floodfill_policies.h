// Acceptance tests and fill policies of the flood fill: value-based policies
// (plain and range criteria) paint as they go; the gradient policy marks a
// visited mask and paints each span once its neighbour rows were scanned.
#ifndef ZELCV_SEGMENT_FLOODFILL_POLICIES_H
#define ZELCV_SEGMENT_FLOODFILL_POLICIES_H

#include <stdint.h>
#include <string.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <type_traits>

#include "segment/floodfill_core.h"
#include "segment/floodfill_runs8u.h"

namespace zelcv {
namespace floodfill {

template <typename T>
inline T* rowOf(uint8_t* base, int step, int y) {
  return reinterpret_cast<T*>(base + int64_t(y) * step);
}

// Plain criterion: every channel equal to the seed's.
template <typename T, int C>
struct EqualTest {
  T s[C];
  bool operator()(const T* v) const {
    bool eq = v[0] == s[0];
    for (int c = 1; c < C; ++c) eq &= v[c] == s[c];
    return eq;
  }
  T lowBound() const { return s[0]; }
  T highBound() const { return s[0]; }
  bool guards() const { return false; }
};

// Range criterion around the seed. A pixel that already holds the new value
// counts as filled, so that a new value inside the interval cannot make the
// fill take its own pixels again.
template <typename T, int C>
struct RangeTest {
  T lo[C], hi[C], nv[C];
  bool guardNew;
  bool operator()(const T* v) const {
    bool in = true;
    for (int c = 0; c < C; ++c) in &= (lo[c] <= v[c]) & (v[c] <= hi[c]);
    if (in && guardNew) {
      bool filled = true;
      for (int c = 0; c < C; ++c) filled &= v[c] == nv[c];
      in = !filled;
    }
    return in;
  }
  T lowBound() const { return lo[0]; }
  T highBound() const { return hi[0]; }
  bool guards() const { return guardNew; }
};

template <typename T, int C>
RangeTest<T, C> makeRangeTest(const T* s, const T* minDelta, const T* maxDelta, const T* nv) {
  RangeTest<T, C> t;
  bool newInside = true;
  for (int c = 0; c < C; ++c) {
    if constexpr (std::is_floating_point<T>::value) {
      t.lo[c] = s[c] - minDelta[c];
      t.hi[c] = s[c] + maxDelta[c];
    } else {
      const int32_t top = int32_t(std::numeric_limits<T>::max());
      t.lo[c] = T(std::max(int32_t(s[c]) - int32_t(minDelta[c]), int32_t(0)));
      t.hi[c] = T(std::min(int32_t(s[c]) + int32_t(maxDelta[c]), top));
    }
    t.nv[c] = nv[c];
    newInside &= (t.lo[c] <= nv[c]) & (nv[c] <= t.hi[c]);
  }
  t.guardNew = newInside;
  return t;
}

// Gradient criterion: candidate q against accepted neighbour p.
template <typename T, int C, bool kFloat = std::is_floating_point<T>::value>
struct GradTest {
  uint32_t minD[C], span[C];
  GradTest(const T* minDelta, const T* maxDelta) {
    for (int c = 0; c < C; ++c) {
      minD[c] = uint32_t(minDelta[c]);
      span[c] = uint32_t(minDelta[c]) + uint32_t(maxDelta[c]);
    }
  }
  bool operator()(const T* q, const T* p) const {
    bool ok = true;
    for (int c = 0; c < C; ++c) ok &= uint32_t(q[c]) + minD[c] - uint32_t(p[c]) <= span[c];
    return ok;
  }
};

template <typename T, int C>
struct GradTest<T, C, true> {
  float shift[C], half[C];
  GradTest(const T* minDelta, const T* maxDelta) {
    for (int c = 0; c < C; ++c) {
      shift[c] = (minDelta[c] - maxDelta[c]) * 0.5f;
      half[c] = (minDelta[c] + maxDelta[c]) * 0.5f;
    }
  }
  bool operator()(const T* q, const T* p) const {
    bool ok = true;
    for (int c = 0; c < C; ++c) ok &= std::fabs(q[c] + shift[c] - p[c]) <= half[c];
    return ok;
  }
};

template <typename T, int C, class Test>
struct PaintPolicy;
template <typename T, int C, bool kConn8>
struct GradPolicy;

// One-channel 8u fills scan and extend runs sixteen pixels at a time.
template <typename T, int C>
constexpr bool kBytes = std::is_same<T, uint8_t>::value && C == 1;
template <typename T, int C, class Test>
using PaintRuns = typename std::conditional<kBytes<T, C>, Runs8u<PaintPolicy<T, C, Test>>,
                                            PixelRuns<PaintPolicy<T, C, Test>>>::type;
template <typename T, int C, bool kConn8>
using GradRuns = typename std::conditional<kBytes<T, C>, GradRuns8u<GradPolicy<T, C, kConn8>>,
                                           PixelRuns<GradPolicy<T, C, kConn8>>>::type;

// Paints as it goes; a pixel is free while the test accepts its value.
template <typename T, int C, class Test>
struct PaintPolicy : PaintRuns<T, C, Test> {
  static constexpr bool kDeferred = false;
  using Row = T*;

  uint8_t* base;
  int step;
  int width;
  Test test;
  T nv[C];

  Row row(int y) const { return rowOf<T>(base, step, y); }
  bool joinsFromRun(Row r, int x, int) const { return test(r + x * C); }
  bool joinsFromSpan(Row r, int x, Row, int, int) const { return test(r + x * C); }
  void take(Row r, int x) const {
    for (int c = 0; c < C; ++c) r[x * C + c] = nv[c];
  }
  void finish(Row, int, int) const {}
};

// Marks the visited mask; paints a span when it is popped and done.
template <typename T, int C, bool kConn8_>
struct GradPolicy : GradRuns<T, C, kConn8_> {
  static constexpr bool kDeferred = true;
  static constexpr bool kConn8 = kConn8_;
  struct Row {
    T* px;
    uint8_t* seen;
  };

  uint8_t* base;
  int step;
  int width;
  uint8_t* mask;  // the mask's pixel (0, 0), inside its frame
  int64_t maskStep;
  GradTest<T, C> test;
  T nv[C];

  Row row(int y) const { return {rowOf<T>(base, step, y), mask + y * maskStep}; }
  bool joinsFromRun(const Row& r, int x, int from) const {
    return !r.seen[x] && test(r.px + x * C, r.px + from * C);
  }
  bool joinsFromSpan(const Row& r, int x, const Row& s, int left, int right) const {
    if (r.seen[x]) return false;
    if (!kConn8) return test(r.px + x * C, s.px + x * C);
    const int last = std::min(x + 1, right);
    for (int k = std::max(x - 1, left); k <= last; ++k)
      if (test(r.px + x * C, s.px + k * C)) return true;
    return false;
  }
  void take(const Row& r, int x) const { r.seen[x] = 1; }
  void finish(const Row& r, int left, int right) const {
    T* p = r.px + left * C;
    if constexpr (kBytes<T, C>) {
      fillBytes(p, right - left + 1, nv[0]);
      return;
    }
    for (int x = left; x <= right; ++x, p += C)
      for (int c = 0; c < C; ++c) p[c] = nv[c];
  }
};

// The visited mask: frame 1, interior 0.
inline void initMask(uint8_t* m, int w, int h) {
  const int64_t mw = int64_t(w) + 2;
  memset(m, 1, size_t(mw));
  for (int y = 0; y < h; ++y) {
    uint8_t* r = m + (int64_t(y) + 1) * mw;
    r[0] = 1;
    memset(r + 1, 0, size_t(w));
    r[w + 1] = 1;
  }
  memset(m + (int64_t(h) + 1) * mw, 1, size_t(mw));
}

}  // namespace floodfill
}  // namespace zelcv

#endif  // ZELCV_SEGMENT_FLOODFILL_POLICIES_H
