// Flood fill from random images, seeds and intervals. The work buffer is a
// block of exactly the size the query answers, so a stack or mask access past
// it is a heap overflow that AddressSanitizer reports; the row padding must
// come back untouched. For 8u one channel the result is checked against a
// breadth-first search of the same criterion: every pixel the fill changed is
// reachable from the seed, and for the plain and range criteria (which paint
// what they fill) the record's area counts exactly the pixels that changed.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <vector>

#include "fuzz_input.h"
#include "zelcv.h"

namespace {

using zelfuzz::Input;

enum Criterion { Plain, Range, Grad };

// Pixels reachable from the seed under the criterion, as a 0/1 map.
std::vector<uint8_t> reachable(const std::vector<uint8_t>& img, int w, int h, int step, ZeliPoint seed,
                               Criterion c, bool eight, int newVal, int lo, int hi) {
  std::vector<uint8_t> seen(size_t(w) * size_t(h));
  const int s = img[size_t(seed.y) * size_t(step) + size_t(seed.x)];
  auto at = [&](int x, int y) { return int(img[size_t(y) * size_t(step) + size_t(x)]); };
  auto joins = [&](int from, int q) {
    switch (c) {
      case Plain: return q == s && q != newVal;
      case Range: return q >= std::max(s - lo, 0) && q <= std::min(s + hi, 255) && q != newVal;
      default: return q >= from - lo && q <= from + hi;
    }
  };
  std::deque<ZeliPoint> queue{seed};
  seen[size_t(seed.y) * size_t(w) + size_t(seed.x)] = 1;
  while (!queue.empty()) {
    ZeliPoint p = queue.front();
    queue.pop_front();
    for (int dy = -1; dy <= 1; ++dy)
      for (int dx = -1; dx <= 1; ++dx) {
        if ((dx == 0 && dy == 0) || (!eight && dx != 0 && dy != 0)) continue;
        const int x = p.x + dx, y = p.y + dy;
        if (x < 0 || y < 0 || x >= w || y >= h || seen[size_t(y) * size_t(w) + size_t(x)]) continue;
        if (!joins(at(p.x, p.y), at(x, y))) continue;
        seen[size_t(y) * size_t(w) + size_t(x)] = 1;
        queue.push_back({x, y});
      }
  }
  return seen;
}

using Fill8u = ZelStatus(ZELCV_CALL*)(Zel8u*, int, ZeliSize, ZeliPoint, Zel8u, Zel8u, Zel8u, ZeliConnectedComp*,
                                      Zel8u*);

ZelStatus ZELCV_CALL plain4(Zel8u* i, int s, ZeliSize r, ZeliPoint p, Zel8u v, Zel8u, Zel8u, ZeliConnectedComp* c,
                            Zel8u* b) {
  return zeliFloodFill_4Con_8u_C1IR(i, s, r, p, v, c, b);
}
ZelStatus ZELCV_CALL plain8(Zel8u* i, int s, ZeliSize r, ZeliPoint p, Zel8u v, Zel8u, Zel8u, ZeliConnectedComp* c,
                            Zel8u* b) {
  return zeliFloodFill_8Con_8u_C1IR(i, s, r, p, v, c, b);
}

void fill8u(Input& in) {
  const int kind = in.range(0, 5);
  const Criterion criterion = Criterion(kind / 2);
  const bool eight = kind % 2;
  static const Fill8u fills[6] = {plain4, plain8, zeliFloodFill_Range4Con_8u_C1IR, zeliFloodFill_Range8Con_8u_C1IR,
                                  zeliFloodFill_Grad4Con_8u_C1IR, zeliFloodFill_Grad8Con_8u_C1IR};
  const int w = in.range(1, 48), h = in.range(1, 32), step = w + in.range(0, 5);
  const ZeliPoint seed{in.range(0, w - 1), in.range(0, h - 1)};
  const int levels = in.range(1, 8);  // few grey levels make regions of interesting shapes
  const Zel8u newVal = Zel8u(in.byte()), minDelta = Zel8u(in.range(0, 4)), maxDelta = Zel8u(in.range(0, 4));
  std::vector<uint8_t> img(size_t(step) * size_t(h));
  in.fill(img.data(), img.size());
  for (uint8_t& v : img) v = uint8_t(v % levels * (240 / levels) + (v & 1));
  const std::vector<uint8_t> before = img;

  int bytes = 0;
  const ZeliSize roi{w, h};
  if ((criterion == Grad ? zeliFloodFillGetSize_Grad(roi, &bytes) : zeliFloodFillGetSize(roi, &bytes)) != zelStatusOk)
    abort();
  std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
  ZeliConnectedComp region;
  std::memset(&region, 0xA5, sizeof region);
  if (fills[kind](img.data(), step, roi, seed, newVal, minDelta, maxDelta, &region, buffer.data()) != zelStatusOk)
    abort();

  const std::vector<uint8_t> reach = reachable(before, w, h, step, seed, criterion, eight, newVal, minDelta, maxDelta);
  long long changed = 0;
  int x0 = w, y0 = h, x1 = -1, y1 = -1;
  for (int y = 0; y < h; ++y)
    for (int x = w; x < step; ++x)
      if (img[size_t(y) * size_t(step) + size_t(x)] != before[size_t(y) * size_t(step) + size_t(x)]) abort();
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      const size_t i = size_t(y) * size_t(step) + size_t(x);
      if (img[i] == before[i]) continue;
      if (img[i] != newVal || !reach[size_t(y) * size_t(w) + size_t(x)]) abort();
      ++changed;
      x0 = std::min(x0, x), x1 = std::max(x1, x), y0 = std::min(y0, y), y1 = std::max(y1, y);
    }
  if (criterion == Grad) {
    long long reachCount = 0;
    for (uint8_t r : reach) reachCount += r;
    if (region.area < double(changed) || region.area > double(reachCount)) abort();
    return;
  }
  if (before[size_t(seed.y) * size_t(step) + size_t(seed.x)] == newVal) {
    if (changed != 0) abort();  // the early exit writes neither image nor record
    return;
  }
  if (region.area != double(changed) || changed < 1) abort();
  // The rectangle grows as spans are popped: when the capped stack wraps,
  // runs that were painted but never popped lie outside it. It always holds
  // the seed and never leaves the painted pixels' bounds.
  const ZeliRect r = region.rect;
  if (r.width < 1 || r.height < 1 || r.x < x0 || r.y < y0 || r.x + r.width - 1 > x1 || r.y + r.height - 1 > y1 ||
      seed.x < r.x || seed.x >= r.x + r.width || seed.y < r.y || seed.y >= r.y + r.height)
    abort();
}

// The other types and channel counts: memory safety and the row padding.
template <typename T, int C, typename Fill>
void fillOther(Input& in, Fill fill, bool grad) {
  const int w = in.range(1, 40), h = in.range(1, 24);
  const int step = (w * C + in.range(0, 3)) * int(sizeof(T));
  const size_t elems = size_t(step) / sizeof(T) * size_t(h);
  std::vector<T> img(elems);
  for (T& v : img) v = T(in.range(0, 3) * 50);
  const std::vector<T> before = img;
  T newVal[3], minDelta[3], maxDelta[3];
  for (int c = 0; c < 3; ++c) newVal[c] = T(in.range(0, 3) * 50), minDelta[c] = T(in.range(0, 60)),
                              maxDelta[c] = T(in.range(0, 60));
  const ZeliPoint seed{in.range(0, w - 1), in.range(0, h - 1)};
  int bytes = 0;
  if ((grad ? zeliFloodFillGetSize_Grad({w, h}, &bytes) : zeliFloodFillGetSize({w, h}, &bytes)) != zelStatusOk)
    abort();
  std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
  ZeliConnectedComp region;
  if (fill(img.data(), step, ZeliSize{w, h}, seed, newVal, minDelta, maxDelta, &region, buffer.data()) != zelStatusOk)
    abort();
  const size_t rowElems = size_t(step) / sizeof(T);
  for (int y = 0; y < h; ++y)
    for (size_t x = size_t(w) * C; x < rowElems; ++x)
      if (std::memcmp(&img[size_t(y) * rowElems + x], &before[size_t(y) * rowElems + x], sizeof(T)) != 0) abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in(data, size);
  switch (in.range(0, 5)) {
    case 0:
    case 1:
    case 2: fill8u(in); break;
    case 3:
      fillOther<Zel16u, 3>(
          in,
          [](Zel16u* i, int s, ZeliSize r, ZeliPoint p, const Zel16u* v, const Zel16u* lo, const Zel16u* hi,
             ZeliConnectedComp* c, Zel8u* b) { return zeliFloodFill_Range8Con_16u_C3IR(i, s, r, p, v, lo, hi, c, b); },
          false);
      break;
    case 4:
      fillOther<Zel32f, 1>(
          in,
          [](Zel32f* i, int s, ZeliSize r, ZeliPoint p, const Zel32f* v, const Zel32f* lo, const Zel32f* hi,
             ZeliConnectedComp* c, Zel8u* b) { return zeliFloodFill_Grad4Con_32f_C1IR(i, s, r, p, *v, *lo, *hi, c, b); },
          true);
      break;
    default:
      fillOther<Zel8u, 3>(
          in,
          [](Zel8u* i, int s, ZeliSize r, ZeliPoint p, const Zel8u* v, const Zel8u* lo, const Zel8u* hi,
             ZeliConnectedComp* c, Zel8u* b) { return zeliFloodFill_Grad8Con_8u_C3IR(i, s, r, p, v, lo, hi, c, b); },
          true);
      break;
  }
  return 0;
}
