// The span-stack flood fill that every fill export runs. A policy supplies
// the acceptance test, how taken pixels are recognised and when they are
// painted; the traversal, the stack and its overflow rule are the same for
// all of them.
#ifndef ZELCV_SEGMENT_FLOODFILL_CORE_H
#define ZELCV_SEGMENT_FLOODFILL_CORE_H

#include <stdint.h>

#include <algorithm>

namespace zelcv {
namespace floodfill {

// One stack entry: a span of row y, the span of its parent row (y + dir)
// from which it was found.
struct Span {
  int32_t y, left, right, parentLeft, parentRight, dir;
};
static_assert(sizeof(Span) == 24, "a stack entry is six 32-bit integers");

struct Outcome {
  int64_t area;
  int top, bottom, left, right;
};

inline uint8_t* alignTo8(uint8_t* p) {
  return reinterpret_cast<uint8_t*>((reinterpret_cast<uintptr_t>(p) + 7) & ~uintptr_t(7));
}

// Policy interface (P):
//   kDeferred           true: taking only marks; spans are painted (and
//                       counted) after both of their neighbour rows were
//                       scanned, so that every test sees the original values
//   Row row(y)          handle of row y
//   joinsFromRun(r, x, from)        pixel x of row r, reached from pixel
//                                   `from` of the same row
//   joinsFromSpan(r, x, s, l, rgt)  pixel x of row r, reached from the
//                                   popped span [l, rgt] of row s
//   take(r, x)          paint (or mark) pixel x
//   finish(r, l, rgt)   paint a popped span (deferred policies)
//   extendLeft(r, x), extendRight(r, x)   whole run through a taken pixel
//   extendRightBeside(r, x, s, l, rgt)    (deferred policies) to the right
//                       through pixels that join from the run or from the
//                       popped span [l, rgt] of row s
//   nextJoin(r, x, to, s, l, rgt)  first column from x to `to` that joins
//                                  from span [l, rgt] of row s, or to + 1
template <class P, bool kConn8>
class SpanFill {
 public:
  SpanFill(P& policy, int width, int height, Span* stack, int64_t capacity)
      : p_(policy), w_(width), h_(height), stack_(stack), cap_(capacity) {}

  Outcome run(int sx, int sy) {
    typename P::Row seedRow = p_.row(sy);
    p_.take(seedRow, sx);
    const int left = p_.extendLeft(seedRow, sx);
    const int right = p_.extendRight(seedRow, sx);
    Outcome out = {0, sy, sy, left, right};
    if (!P::kDeferred) {
      out.area = right - left + 1;
      // A single row has nothing above or below the seed span.
      if (h_ == 1) return out;
    }
    // The mask's frame of a deferred policy stands in for the image edges,
    // so it always starts downwards.
    const int dir = (!P::kDeferred && sy == h_ - 1) ? -1 : 1;
    push({sy, left, right, right + 1, right, dir});
    while (count_ > 0) {
      const Span e = stack_[--count_];
      out.top = std::min(out.top, int(e.y));
      out.bottom = std::max(out.bottom, int(e.y));
      out.left = std::min(out.left, int(e.left));
      out.right = std::max(out.right, int(e.right));
      const typename P::Row cur = p_.row(e.y);
      const int lo = kConn8 ? std::max(e.left - 1, 0) : e.left;
      const int hi = kConn8 ? std::min(e.right + 1, w_ - 1) : e.right;
      const int far = e.y - e.dir;
      if (far >= 0 && far < h_) scan(far, lo, hi, cur, e, e.dir, out.area);
      const int near = e.y + e.dir;
      if (near >= 0 && near < h_) {
        // The parent span itself is taken already: only the parts of the
        // near row that it did not cover can hold new pixels.
        scan(near, lo, std::min(e.parentLeft - 1, hi), cur, e, -e.dir, out.area);
        scan(near, std::max(e.parentRight + 1, lo), hi, cur, e, -e.dir, out.area);
      }
      if (P::kDeferred) {
        p_.finish(cur, e.left, e.right);
        out.area += e.right - e.left + 1;
      }
    }
    return out;
  }

 private:
  // When a push fills the stack, the count restarts at 0: later pushes
  // overwrite the bottom, and the fill ends once the count is 0 again.
  void push(const Span& s) {
    stack_[count_] = s;
    if (++count_ >= cap_) count_ = 0;
  }

  // Columns from..to of row y, reached from the popped span e (row cur).
  void scan(int y, int from, int to, typename P::Row cur, const Span& e, int childDir,
            int64_t& area) {
    const typename P::Row r = p_.row(y);
    for (int x = from; x <= to;) {
      x = p_.nextJoin(r, x, to, cur, e.left, e.right);
      if (x > to) break;
      p_.take(r, x);
      const int runLeft = p_.extendLeft(r, x);
      int runRight;
      if constexpr (P::kDeferred) {
        // A neighbour-relative run also goes on through pixels that pass
        // against the span beside them, so that it is not cut into pieces;
        // the pixels taken are the same, the entries fewer.
        runRight = p_.extendRightBeside(r, x, cur, e.left, e.right);
      } else {
        runRight = p_.extendRight(r, x);
        area += runRight - runLeft + 1;
      }
      push({y, runLeft, runRight, e.left, e.right, childDir});
      // The pixel after a run has failed every test that could take it.
      x = runRight + 2;
    }
  }

  P& p_;
  const int w_, h_;
  Span* const stack_;
  const int64_t cap_;
  int64_t count_ = 0;
};

// Scans and run extension one pixel at a time, for policies that have
// nothing faster.
template <class Derived>
struct PixelRuns {
  template <class Row>
  int nextJoin(const Row& r, int x, int to, const Row& s, int left, int right) {
    Derived& d = static_cast<Derived&>(*this);
    while (x <= to && !d.joinsFromSpan(r, x, s, left, right)) ++x;
    return x;
  }
  template <class Row>
  int extendLeft(const Row& r, int x) {
    Derived& d = static_cast<Derived&>(*this);
    while (x > 0 && d.joinsFromRun(r, x - 1, x)) d.take(r, --x);
    return x;
  }
  template <class Row>
  int extendRight(const Row& r, int x) {
    Derived& d = static_cast<Derived&>(*this);
    const int last = d.width - 1;
    while (x < last && d.joinsFromRun(r, x + 1, x)) d.take(r, ++x);
    return x;
  }
  template <class Row>
  int extendRightBeside(const Row& r, int x, const Row& s, int left, int right) {
    Derived& d = static_cast<Derived&>(*this);
    const int last = d.width - 1;
    const int reach = right + (Derived::kConn8 ? 1 : 0);
    while (x < last &&
           (d.joinsFromRun(r, x + 1, x) || (x + 1 <= reach && d.joinsFromSpan(r, x + 1, s, left, right))))
      d.take(r, ++x);
    return x;
  }
};

}  // namespace floodfill
}  // namespace zelcv

#endif  // ZELCV_SEGMENT_FLOODFILL_CORE_H
