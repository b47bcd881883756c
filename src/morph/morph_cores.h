// The processing cores of flat morphology as templates over the element type
// and the operation, which carries the instruction set of the row kernels.
// morph_core.cpp instantiates them for the baseline and morph_core_avx2.cpp
// for AVX2; everything here has internal linkage, so that the two copies
// never meet at link time.
#ifndef ZELCV_MORPH_MORPH_CORES_H
#define ZELCV_MORPH_MORPH_CORES_H

#include <stdint.h>
#include <string.h>

#include <algorithm>

#include "core/alloc.h"
#include "filter/border.h"
#include "kernels/minmax.h"
#include "morph/morph_core.h"

namespace zelcv {
namespace morph {
namespace {

template <typename T>
const T* rowAt(const T* base, int step, int r) {
  return reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(base) + int64_t(r) * step);
}
template <typename T>
T* rowAt(T* base, int step, int r) {
  return reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(base) + int64_t(r) * step);
}

int clampInt(int v, int lo, int hi) { return v < lo ? lo : (v > hi ? hi : v); }

// Windows reaching more than one image size past an edge see only the edge
// pixel: clip the window [s, s + K - 1] to [-(n - 1), n - 1].
void clipWindow(int& s, int& K, int n) {
  int e = clampInt(s + K - 1, -(n - 1), n - 1);
  s = clampInt(s, -(n - 1), n - 1);
  K = e - s + 1;
}

// Whether the destination rows may overwrite source rows still to be read.
bool overlaps(const void* src, int srcStep, const void* dst, int dstStep, int height, size_t rowBytes) {
  const uint8_t* s = static_cast<const uint8_t*>(src);
  const uint8_t* d = static_cast<const uint8_t*>(dst);
  const uint8_t* sEnd = s + int64_t(srcStep) * (height - 1) + rowBytes;
  const uint8_t* dEnd = d + int64_t(dstStep) * (height - 1) + rowBytes;
  return s < dEnd && d < sEnd;
}

// Vertical windows up to this height combine rows directly; taller ones use
// the van Herk scheme.
constexpr int kDirectHeights = 9;

// Row slots in the work memory, each a 32-aligned row of the ROI.
template <typename T>
struct Slots {
  uint8_t* base;
  size_t stride;
  T* operator[](int i) const { return reinterpret_cast<T*>(base + size_t(i) * stride); }
};
template <typename T>
Slots<T> makeSlots(uint8_t* work, int width, int channels) {
  return {alignUp(work, 32), size_t(alignSize(int64_t(width) * channels * sizeof(T), 32))};
}

// The rectangle: horizontal window maxima per source row into row slots,
// then the vertical window over those rows: a direct ring of Kv + 1 rows for
// short windows, otherwise the van Herk / Gil-Werman scheme (blocks of Kv rows with
// suffix maxima inside the block and prefix maxima of the next one), whose
// cost per pixel does not depend on the height.
template <typename T, typename Op>
void rectCore(const T* src, int srcStep, T* dst, int dstStep, int W, int H, int c, int rw, int rh, int ox,
              int oy, uint8_t* work, const RowSink& sink) {
  int s = -ox, K = rw, sv = -oy, Kv = rh;
  clipWindow(s, K, W);
  clipWindow(sv, Kv, H);
  const int n = W * c;
  const bool inPlace = overlaps(src, srcStep, dst, dstStep, H, sizeof(T) * size_t(n));
  const Slots<T> slot = makeSlots<T>(work, W, c);
  // A window wholly above its output row is streamed bottom-up, so that in
  // place no row is overwritten before it is read.
  const bool up = sv + Kv - 1 < 0;
  auto extRow = [&](int k) { return rowAt(src, srcStep, clampInt(up ? H + sv + Kv - 2 - k : sv + k, 0, H - 1)); };
  auto outRow = [&](int m) { return rowAt(dst, dstStep, up ? H - 1 - m : m); };
  auto done = [&](int m, int count) {
    for (int i = m; i < m + count; ++i) sink(up ? H - 1 - i : i);
  };
  // Not in place, the last output row is free scratch until it is written.
  T* temp = inPlace ? nullptr : outRow(H - 1);
  auto hpass = [&](int k, T* out) {
    minmax::windowRow<T, Op>(extRow(k), out, W, c, s, K, out == temp ? nullptr : temp);
  };
  const int steps = H + Kv - 1;

  if (Kv == 1) {
    for (int m = 0; m < H; ++m) {
      if (!inPlace) {
        hpass(m, outRow(m));
      } else {
        hpass(m, slot[0]);
        memcpy(outRow(m), slot[0], sizeof(T) * size_t(n));
      }
      done(m, 1);
    }
    return;
  }
  if (Kv <= kDirectHeights && 2 * Kv <= H) {
    // Four output rows at a time share Kv - 3 rows (heights 4 and more), two
    // share Kv - 1: a ring of Kv + 3 rows (Kv + 1 below height 4).
    const int ring = Kv >= 4 ? Kv + 3 : Kv + 1;
    const T* common[kDirectHeights];
    int next = 0;
    auto ensure = [&](int upTo) {
      for (; next <= upTo; ++next) hpass(next, slot[next % ring]);
    };
    for (int m = 0; m < H;) {
      if (Kv >= 4 && m + 3 < H) {
        ensure(m + Kv + 2);
        T* out[4] = {outRow(m), outRow(m + 1), outRow(m + 2), outRow(m + 3)};
        const T* a[3] = {slot[m % ring], slot[(m + 1) % ring], slot[(m + 2) % ring]};
        const T* b[3] = {slot[(m + Kv) % ring], slot[(m + Kv + 1) % ring], slot[(m + Kv + 2) % ring]};
        for (int i = 0; i < Kv - 3; ++i) common[i] = slot[(m + 3 + i) % ring];
        minmax::CountTableTo<minmax::CombineQuad, T, Op, kDirectHeights>::kernel[Kv - 2](out, common, a, b, n);
        done(m, 4);
        m += 4;
      } else if (m + 1 < H) {
        ensure(m + Kv);
        for (int i = 0; i < Kv - 1; ++i) common[i] = slot[(m + 1 + i) % ring];
        minmax::CountTableTo<minmax::CombinePair, T, Op, kDirectHeights>::kernel[Kv - 1](
            outRow(m), outRow(m + 1), common, slot[m % ring], slot[(m + Kv) % ring], n);
        done(m, 2);
        m += 2;
      } else {
        ensure(m + Kv - 1);
        for (int i = 0; i < Kv; ++i) common[i] = slot[(m + i) % ring];
        minmax::combineRows<T, Op>(outRow(m), common, Kv, n);
        done(m, 1);
        m += 1;
      }
    }
    return;
  }
  for (int k = 0; k < steps; ++k) {
    const int b = k / Kv, q = k % Kv;
    const int hg = (b & 1) * Kv, sg = Kv - hg;  // this block's rows, the previous block's
    T* h = slot[hg + q];
    hpass(k, h);
    if (q == Kv - 1) {
      for (int i = Kv - 2; i >= 0; --i) minmax::combineForward<T, Op>(slot[hg + i], slot[hg + i], slot[hg + i + 1], n);
      memcpy(outRow(k - Kv + 1), slot[hg], sizeof(T) * size_t(n));
      done(k - Kv + 1, 1);
    } else if (b > 0) {
      // The prefix of this block so far takes the slot of the previous
      // block's suffix row q, used by the step before (row 0 at the block end).
      minmax::vanHerkStep<T, Op>(outRow(k - Kv + 1), slot[sg + q], q ? slot[sg + q - 1] : nullptr, h,
                                 slot[sg + q + 1], n);
      done(k - Kv + 1, 1);
    }
  }
}

// Kind 2: per source row, the horizontal maxima of the distinct runs; per
// output row, the maximum of the run rows that the element's rows select.
template <typename T, typename Op>
void runsCore(const T* src, int srcStep, T* dst, int dstStep, int W, int H, int c, const View& v,
              uint8_t* work, const RowSink& sink) {
  const RowEntry* rows = v.rows;
  const int rowCount = v.shape.rowCount, runCount = v.shape.runCount;
  const int dyMin = rows[0].dy, dyMax = rows[rowCount - 1].dy, span = dyMax - dyMin + 1;
  const int n = W * c;
  const bool inPlace = overlaps(src, srcStep, dst, dstStep, H, sizeof(T) * size_t(n));
  const T** pointers = reinterpret_cast<const T**>(alignUp(work, 16));
  const Slots<T> slot = makeSlots<T>(work + 16 + sizeof(void*) * size_t(rowCount), W, c);
  auto srcRow = [&](int r) { return rowAt(src, srcStep, clampInt(r, 0, H - 1)); };
  // A single-pixel run at the anchor is the source row itself.
  T* temp = inPlace ? nullptr : rowAt(dst, dstStep, H - 1);  // scratch until written last
  auto aliased = [&](int j) { return !inPlace && v.runs[j].start == 0 && v.runs[j].end == 0; };
  // A run at most twice as long as a shorter run inside it is the maximum of
  // that run's row read at two offsets: plan the runs shortest first.
  struct Plan {
    int run, s, K, parent;
  };
  constexpr int kPlanned = 32;
  Plan plan[kPlanned];
  const bool planned = runCount <= kPlanned;
  if (planned) {
    for (int j = 0; j < runCount; ++j) {
      plan[j] = {j, v.runs[j].start, v.runs[j].end - v.runs[j].start + 1, -1};
      clipWindow(plan[j].s, plan[j].K, W);
    }
    std::sort(plan, plan + runCount, [](const Plan& a, const Plan& b) { return a.K < b.K; });
    for (int j = 1; j < runCount; ++j)
      for (int p = j - 1; p >= 0 && plan[j].parent < 0; --p)
        if (plan[p].s >= plan[j].s && plan[p].s + plan[p].K <= plan[j].s + plan[j].K && 2 * plan[p].K >= plan[j].K)
          plan[j].parent = p;
  }
  for (int r = dyMin; r <= H - 1 + dyMax; ++r) {
    const int g = (r - dyMin) % span;
    auto runRow = [&](int j) -> const T* { return aliased(j) ? srcRow(r) : slot[g * runCount + j]; };
    for (int i = 0; i < runCount; ++i) {
      if (!planned) {
        int s = v.runs[i].start, K = v.runs[i].end - v.runs[i].start + 1;
        clipWindow(s, K, W);
        if (!aliased(i)) minmax::windowRow<T, Op>(srcRow(r), slot[g * runCount + i], W, c, s, K, temp);
        continue;
      }
      const Plan& q = plan[i];
      if (aliased(q.run)) continue;
      T* out = slot[g * runCount + q.run];
      if (q.parent < 0) {
        minmax::windowRow<T, Op>(srcRow(r), out, W, c, q.s, q.K, temp);
      } else {
        const Plan& p = plan[q.parent];
        minmax::windowFromTwo<T, Op>(runRow(p.run), out, W, c, q.s - p.s, q.s + q.K - p.s - p.K);
      }
    }
    const int y = r - dyMax;
    if (y < 0) continue;
    for (int i = 0; i < rowCount; ++i) {
      const int rr = y + rows[i].dy, j = rows[i].run;
      pointers[i] = aliased(j) ? srcRow(rr) : slot[((rr - dyMin) % span) * runCount + j];
    }
    minmax::combineRows<T, Op>(rowAt(dst, dstStep, y), pointers, rowCount, n);
    sink(y);
  }
}

// Any element and any border, in place: the maximum over every on element,
// one element at a time, reading rows beyond the ROI from memory on flagged
// sides and replicating the edge elsewhere; the ROI rows still needed are
// kept in a ring.
template <typename T, typename Op>
void generalCore(const T* src, int srcStep, T* dst, int dstStep, int W, int H, int c, ZeliBorderType border,
                 const View& v, uint8_t* work, const RowSink& sink) {
  const int mw = v.maskWidth, mh = v.maskHeight, ax = v.anchorX, ay = v.anchorY;
  const int n = W * c;
  const bool inPlace = overlaps(src, srcStep, dst, dstStep, H, sizeof(T) * size_t(n));
  const Slots<T> ring = makeSlots<T>(work, W, c);
  const bool top = inMemoryTop(border), bottom = inMemoryBottom(border);
  const bool left = inMemoryLeft(border), right = inMemoryRight(border);
  int loaded = 0;
  for (int y = 0; y < H; ++y) {
    if (inPlace)
      for (int last = std::min(H - 1, y + mh - 1 - ay); loaded <= last; ++loaded)
        memcpy(ring[loaded % mh], rowAt(src, srcStep, loaded), sizeof(T) * size_t(n));
    T* acc = rowAt(dst, dstStep, y);
    bool first = true;
    for (int j = 0; j < mh; ++j) {
      const int r = y + j - ay;
      const T* mem;
      const T* roi;
      if ((r < 0 && top) || (r >= H && bottom)) {
        roi = mem = rowAt(src, srcStep, r);
      } else {
        const int rc = clampInt(r, 0, H - 1);
        mem = rowAt(src, srcStep, rc);
        roi = inPlace ? ring[rc % mh] : mem;
      }
      const uint8_t* m = v.mask + int64_t(j) * mw;
      for (int i = 0; i < mw; ++i) {
        if (!m[i]) continue;
        if (first)
          minmax::combineShifted<T, Op, true>(acc, W, c, roi, mem, left, right, i - ax);
        else
          minmax::combineShifted<T, Op, false>(acc, W, c, roi, mem, left, right, i - ax);
        first = false;
      }
    }
    sink(y);
  }
}

// Not in place: every output row in one pass over the on elements, reading
// the source rows in place (eight elements at a time); only the columns
// whose elements reach past a replicated side are done element by element.
template <typename T, typename Op>
void pointsCore(const T* src, int srcStep, T* dst, int dstStep, int W, int H, int c, ZeliBorderType border,
                const View& v, const RowSink& sink) {
  const int mw = v.maskWidth, mh = v.maskHeight, ax = v.anchorX, ay = v.anchorY;
  const bool top = inMemoryTop(border), bottom = inMemoryBottom(border);
  const bool left = inMemoryLeft(border), right = inMemoryRight(border);
  int reachLeft = 0, reachRight = 0;
  for (int j = 0; j < mh; ++j)
    for (int i = 0; i < mw; ++i)
      if (v.mask[int64_t(j) * mw + i]) {
        reachLeft = std::max(reachLeft, ax - i);
        reachRight = std::max(reachRight, i - ax);
      }
  const int xl = left ? 0 : std::min(W, reachLeft);
  const int xr = std::max(xl, right ? W : W - reachRight);
  auto srcRow = [&](int r) {
    return rowAt(src, srcStep, (r < 0 && top) || (r >= H && bottom) ? r : clampInt(r, 0, H - 1));
  };
  constexpr int kChunk = 8;
  const T* rows[kChunk];
  for (int y = 0; y < H; ++y) {
    T* out = rowAt(dst, dstStep, y);
    int count = 0;
    bool first = true;
    auto flush = [&]() {
      using Table = minmax::CountTableTo<minmax::CombineRows, T, Op, kChunk>;
      Table::kernel[count](out + xl * c, rows, (xr - xl) * c);
      first = false;
      count = 0;
      rows[count++] = out + xl * c;  // later chunks combine with what is there
    };
    for (int j = 0; j < mh; ++j) {
      const T* row = srcRow(y + j - ay);
      for (int i = 0; i < mw; ++i) {
        if (!v.mask[int64_t(j) * mw + i]) continue;
        rows[count++] = row + (xl + i - ax) * c;
        if (count == kChunk) flush();
      }
    }
    if (first || count > 1) flush();
    // Columns whose elements reach past a replicated side.
    for (int x = 0; x < W; x = (x + 1 == xl) ? std::max(xl, xr) : x + 1) {
      if (x >= xl && x < xr) continue;
      for (int ch = 0; ch < c; ++ch) {
        bool any = false;
        T best = T();
        for (int j = 0; j < mh; ++j) {
          const T* row = srcRow(y + j - ay);
          for (int i = 0; i < mw; ++i) {
            if (!v.mask[int64_t(j) * mw + i]) continue;
            int px = x + i - ax;
            if ((px < 0 && !left) || (px >= W && !right)) px = clampInt(px, 0, W - 1);
            const T value = minmax::ld(row + px * c + ch);
            best = any ? Op::s(best, value) : value;
            any = true;
          }
        }
        minmax::st(out + x * c + ch, best);
      }
    }
    sink(y);
  }
}

template <typename T>
void copyRows(const T* src, int srcStep, T* dst, int dstStep, int H, size_t rowBytes) {
  if (src == dst) return;
  for (int y = 0; y < H; ++y) memmove(rowAt(dst, dstStep, y), rowAt(src, srcStep, y), rowBytes);
}

template <typename T, typename Op>
void applyWith(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int c, ZeliBorderType border,
               const View& v, uint8_t* work, const RowSink& sink) {
  const int W = roi.width, H = roi.height;
  if (borderKind(border) == zelBorderInMemory) border = zelBorderReplicate | 0xF0;
  const bool flags = (border & 0xF0) != 0;
  if (v.kind == kEmpty) {
    copyRows(src, srcStep, dst, dstStep, H, sizeof(T) * size_t(W) * c);
    for (int y = 0; y < H; ++y) sink(y);
  } else if (v.kind == kRectangle && !flags)
    rectCore<T, Op>(src, srcStep, dst, dstStep, W, H, c, v.shape.rectWidth, v.shape.rectHeight,
                    v.shape.rectOffsetX, v.shape.rectOffsetY, work, sink);
  else if (v.kind == kRuns && !flags)
    runsCore<T, Op>(src, srcStep, dst, dstStep, W, H, c, v, work, sink);
  else if (overlaps(src, srcStep, dst, dstStep, H, sizeof(T) * size_t(W) * c))
    generalCore<T, Op>(src, srcStep, dst, dstStep, W, H, c, border, v, work, sink);
  else
    pointsCore<T, Op>(src, srcStep, dst, dstStep, W, H, c, border, v, sink);
}

}  // namespace

// The entries of one instruction set.
template <typename T, typename Isa>
void Cores<T, Isa>::rect(bool max, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int channels,
                       int rw, int rh, int ox, int oy, uint8_t* work) {
  if (max)
    rectCore<T, minmax::MaxOp<T, Isa>>(src, srcStep, dst, dstStep, roi.width, roi.height, channels, rw, rh, ox,
                                       oy, work, RowSink());
  else
    rectCore<T, minmax::MinOp<T, Isa>>(src, srcStep, dst, dstStep, roi.width, roi.height, channels, rw, rh, ox,
                                       oy, work, RowSink());
}

template <typename T, typename Isa>
void Cores<T, Isa>::apply(bool dilate, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int channels,
                        ZeliBorderType border, const View& state, uint8_t* work, const RowSink& sink) {
  if (dilate)
    applyWith<T, minmax::MaxOp<T, Isa>>(src, srcStep, dst, dstStep, roi, channels, border, state, work, sink);
  else
    applyWith<T, minmax::MinOp<T, Isa>>(src, srcStep, dst, dstStep, roi, channels, border, state, work, sink);
}

}  // namespace morph
}  // namespace zelcv

#endif  // ZELCV_MORPH_MORPH_CORES_H
