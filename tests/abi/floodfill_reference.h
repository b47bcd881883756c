// Every flood-fill member behind one call shape, and a breadth-first
// reference fill: a queue over single pixels, no spans, no stack limit.
#ifndef ZELCV_TESTS_FLOODFILL_REFERENCE_H
#define ZELCV_TESTS_FLOODFILL_REFERENCE_H

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <deque>
#include <limits>
#include <type_traits>
#include <vector>

#include "support/test_image.h"
#include "zelcv.h"

namespace zeltest {

enum class Criterion { Plain, Range, Grad };

// A member with three-channel style arguments; one-channel members use the
// first element of each array.
template <typename T>
struct FillMember {
  const char* name;
  int channels;
  Criterion criterion;
  bool conn8;
  ZelStatus (*call)(T* image, int step, ZeliSize roi, ZeliPoint seed, const T* nv, const T* minD,
                    const T* maxD, ZeliConnectedComp* region, Zel8u* buffer);
};

#define ZT_PLAIN1(fn, T, c8)                                                                      \
  FillMember<T>{#fn, 1, Criterion::Plain, c8,                                                     \
                [](T* i, int s, ZeliSize r, ZeliPoint p, const T* v, const T*, const T*,          \
                   ZeliConnectedComp* g, Zel8u* b) { return fn(i, s, r, p, v[0], g, b); }}
#define ZT_PLAIN3(fn, T, c8)                                                                      \
  FillMember<T>{#fn, 3, Criterion::Plain, c8,                                                     \
                [](T* i, int s, ZeliSize r, ZeliPoint p, const T* v, const T*, const T*,          \
                   ZeliConnectedComp* g, Zel8u* b) { return fn(i, s, r, p, v, g, b); }}
#define ZT_DELTA1(fn, T, crit, c8)                                                                \
  FillMember<T>{#fn, 1, Criterion::crit, c8,                                                      \
                [](T* i, int s, ZeliSize r, ZeliPoint p, const T* v, const T* lo, const T* hi,    \
                   ZeliConnectedComp* g, Zel8u* b) { return fn(i, s, r, p, v[0], lo[0], hi[0], g, b); }}
#define ZT_DELTA3(fn, T, crit, c8)                                                                \
  FillMember<T>{#fn, 3, Criterion::crit, c8,                                                      \
                [](T* i, int s, ZeliSize r, ZeliPoint p, const T* v, const T* lo, const T* hi,    \
                   ZeliConnectedComp* g, Zel8u* b) { return fn(i, s, r, p, v, lo, hi, g, b); }}
#define ZT_DELTA_ALL(crit, suf, T)                                                                 \
  ZT_DELTA1(zeliFloodFill_##crit##4Con_##suf##_C1IR, T, crit, false),                             \
      ZT_DELTA3(zeliFloodFill_##crit##4Con_##suf##_C3IR, T, crit, false),                         \
      ZT_DELTA1(zeliFloodFill_##crit##8Con_##suf##_C1IR, T, crit, true),                          \
      ZT_DELTA3(zeliFloodFill_##crit##8Con_##suf##_C3IR, T, crit, true)
#define ZT_PLAIN_ALL(suf, T)                                                                       \
  ZT_PLAIN1(zeliFloodFill_4Con_##suf##_C1IR, T, false), ZT_PLAIN3(zeliFloodFill_4Con_##suf##_C3IR, T, false), \
      ZT_PLAIN1(zeliFloodFill_8Con_##suf##_C1IR, T, true),                                        \
      ZT_PLAIN3(zeliFloodFill_8Con_##suf##_C3IR, T, true)

template <typename T>
std::vector<FillMember<T>> fillMembers();

template <>
inline std::vector<FillMember<Zel8u>> fillMembers() {
  return {ZT_PLAIN_ALL(8u, Zel8u), ZT_DELTA_ALL(Range, 8u, Zel8u), ZT_DELTA_ALL(Grad, 8u, Zel8u)};
}
template <>
inline std::vector<FillMember<Zel16u>> fillMembers() {
  return {ZT_PLAIN_ALL(16u, Zel16u), ZT_DELTA_ALL(Range, 16u, Zel16u), ZT_DELTA_ALL(Grad, 16u, Zel16u)};
}
template <>
inline std::vector<FillMember<Zel32f>> fillMembers() {
  return {ZT_PLAIN_ALL(32f, Zel32f), ZT_DELTA_ALL(Range, 32f, Zel32f), ZT_DELTA_ALL(Grad, 32f, Zel32f)};
}
template <>
inline std::vector<FillMember<Zel32s>> fillMembers() {
  return {ZT_PLAIN1(zeliFloodFill_4Con_32s_C1IR, Zel32s, false),
          ZT_PLAIN1(zeliFloodFill_8Con_32s_C1IR, Zel32s, true)};
}

// A copy with its own memory (a TestImage copied member-wise would still
// point into the original's block).
template <typename T>
TestImage<T> cloneImage(const TestImage<T>& a) {
  Layout l;
  l.width = a.width();
  l.height = a.height();
  l.channels = a.channels();
  l.padBytes = a.step() - a.width() * a.channels() * int(sizeof(T));
  TestImage<T> b(l);
  for (int y = 0; y < a.height(); ++y)
    std::memcpy(b.row(y), a.row(y), size_t(a.width()) * a.channels() * sizeof(T));
  return b;
}

struct RefResult {
  bool filled = false;  // false: the seed already held the new value
  int64_t area = 0;
  ZeliRect rect = {0, 0, 0, 0};
};

// The criteria as the header states them, per pixel.
template <typename T>
struct RefTest {
  int channels;
  Criterion criterion;
  T seed[3], nv[3], minD[3], maxD[3];

  static bool pass(T v, T lo, T hi) { return lo <= v && v <= hi; }

  // Plain and range: does value v join the region?
  bool joins(const T* v) const {
    bool all = true, isNew = true;
    for (int c = 0; c < channels; ++c) {
      isNew &= v[c] == nv[c];
      if (criterion == Criterion::Plain) {
        all &= v[c] == seed[c];
      } else if constexpr (std::is_floating_point<T>::value) {
        all &= pass(v[c], T(seed[c] - minD[c]), T(seed[c] + maxD[c]));
      } else {
        const int64_t lo = std::max<int64_t>(int64_t(seed[c]) - minD[c], 0);
        const int64_t hi = std::min<int64_t>(int64_t(seed[c]) + maxD[c], std::numeric_limits<T>::max());
        all &= lo <= v[c] && v[c] <= hi;
      }
    }
    return all && !isNew;
  }

  // Gradient: candidate q from accepted p.
  bool steps(const T* q, const T* p) const {
    bool all = true;
    for (int c = 0; c < channels; ++c) {
      if constexpr (std::is_floating_point<T>::value) {
        const float d = std::fabs(q[c] + (minD[c] - maxD[c]) * 0.5f - p[c]);
        all &= d <= (minD[c] + maxD[c]) * 0.5f;
      } else {
        all &= int64_t(p[c]) - minD[c] <= int64_t(q[c]) && int64_t(q[c]) <= int64_t(p[c]) + maxD[c];
      }
    }
    return all;
  }
};

// Breadth-first fill of `image` in place.
template <typename T>
RefResult referenceFill(TestImage<T>& image, ZeliPoint seed, bool conn8, const RefTest<T>& t) {
  RefResult r;
  const int w = image.width(), h = image.height(), C = t.channels;
  const T* s = &image.at(seed.x, seed.y);
  if (t.criterion != Criterion::Grad) {
    bool same = true;
    for (int c = 0; c < C; ++c) same &= s[c] == t.nv[c];
    if (same) return r;
  }
  r.filled = true;
  std::vector<uint8_t> in(size_t(w) * h, 0);
  std::deque<ZeliPoint> queue{seed};
  in[size_t(seed.y) * w + seed.x] = 1;
  int left = seed.x, right = seed.x, top = seed.y, bottom = seed.y;
  while (!queue.empty()) {
    const ZeliPoint p = queue.front();
    queue.pop_front();
    ++r.area;
    left = std::min(left, p.x), right = std::max(right, p.x);
    top = std::min(top, p.y), bottom = std::max(bottom, p.y);
    for (int dy = -1; dy <= 1; ++dy)
      for (int dx = -1; dx <= 1; ++dx) {
        if ((dx == 0 && dy == 0) || (!conn8 && dx != 0 && dy != 0)) continue;
        const int x = p.x + dx, y = p.y + dy;
        if (x < 0 || x >= w || y < 0 || y >= h || in[size_t(y) * w + x]) continue;
        const bool ok = t.criterion == Criterion::Grad ? t.steps(&image.at(x, y), &image.at(p.x, p.y))
                                                       : t.joins(&image.at(x, y));
        if (ok) {
          in[size_t(y) * w + x] = 1;
          queue.push_back({x, y});
        }
      }
  }
  // Painted only now, so that gradient steps saw the original values.
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      if (in[size_t(y) * w + x])
        for (int c = 0; c < C; ++c) image.at(x, y, c) = t.nv[c];
  r.rect = {left, top, right - left + 1, bottom - top + 1};
  return r;
}

}  // namespace zeltest

#endif  // ZELCV_TESTS_FLOODFILL_REFERENCE_H
