// Row kernels for running maxima and minima, shared by the morphology
// families: element-wise combination of rows, horizontal window maxima (one
// kernel per width 1..15, and a generic kernel that builds 4-, 16-, 64-...
// pixel windows, so that its cost grows with the logarithm of the width),
// and shifted combination with replicated or in-memory row ends. Elements of
// a multi-channel row are independent; a window step is one pixel, that is
// `channels` elements. The operation type names the instruction set (MaxOp<T>
// is the baseline, MaxOp<T, avx2::Isa> the AVX2 form, built only in AVX2
// files); both give the same results.
#ifndef ZELCV_KERNELS_MINMAX_H
#define ZELCV_KERNELS_MINMAX_H

#include <string.h>

#include <utility>

#include "kernels/simd.h"

namespace zelcv {
namespace minmax {

// Scalar and vector operations agree on every ordered value: the scalar forms
// repeat what the vector instructions do (first operand when it wins). The
// operation carries the instruction set of its kernels; `v` also serves the
// 16-byte vectors that finish a row after the wide ones.
template <typename T, typename Isa = simd::Sse2>
struct MaxOp {
  using V = simd::Vec<T, Isa>;
  static T s(T a, T b) { return a > b ? a : b; }
  template <typename W = V>
  static typename W::Raw v(typename W::Raw a, typename W::Raw b) { return W::max(a, b); }
};
template <typename T, typename Isa = simd::Sse2>
struct MinOp {
  using V = simd::Vec<T, Isa>;
  static T s(T a, T b) { return a < b ? a : b; }
  template <typename W = V>
  static typename W::Raw v(typename W::Raw a, typename W::Raw b) { return W::min(a, b); }
};

// Scalar accesses to rows go through these: 32f rows may be misaligned.
template <typename T> inline T ld(const T* p) { return simd::loadOne(p); }
template <typename T> inline void st(T* p, T v) { simd::storeOne(p, v); }

template <typename W>
struct Width {
  using type = W;
};

// Whole vectors over [0, n): of the operation's own width, or of 16 bytes
// when n is shorter; the last vector ends at n and overlaps the one before
// rather than leaving single elements. Each helper returns where the single
// elements start (0 when n is below 16 bytes, else n). Bodies use `W` for
// every load, store and operation.
//
// vectorLoop calls body(Width<W>(), i) per vector, so an element may be done
// twice: the outputs must not be inputs of the same call.
template <typename T, typename Op, typename Body>
inline int vectorLoop(int n, Body&& body) {
  auto cover = [&](auto w) {
    using W = typename decltype(w)::type;
    if (n < W::kLanes) return false;
    for (int i = 0; i + W::kLanes < n; i += W::kLanes) body(w, i);
    body(w, n - W::kLanes);
    return true;
  };
  return cover(Width<typename Op::V>()) || cover(Width<simd::Vec<T>>()) ? n : 0;
}

// out[i..] = compute(Width<W>(), i), ascending with the last vector
// computed before anything is stored, so that `out` may be a row that the
// computation reads at or after the elements it writes; or descending
// (`Down`) with the first vector held back, for rows read at or before them.
template <typename T, typename Op, bool Down = false, typename Compute>
inline int mapVectors(T* out, int n, Compute&& compute) {
  auto cover = [&](auto w) {
    using W = typename decltype(w)::type;
    constexpr int L = W::kLanes;
    if (n < L) return false;
    const int start = Down ? n - L : 0, step = Down ? -L : L, held = Down ? 0 : n - L;
    auto run = [&]() {  // the n / L vectors that do not overlap
      for (int i = start, k = n / L; k > 0; --k, i += step) W::storeu(out + i, compute(w, i));
    };
    if (n % L == 0) {  // plain order, kinder to the prefetcher
      run();
      return true;
    }
    const auto last = compute(w, held);
    run();
    W::storeu(out + held, last);
    return true;
  };
  return cover(Width<typename Op::V>()) || cover(Width<simd::Vec<T>>()) ? n : 0;
}

// A kernel template instantiated for counts 1..N, indexed by the count;
// `Which::get<N, T, Op>()` names the instance.
template <typename Which, typename T, typename Op, typename Counts>
struct CountTable;
template <typename Which, typename T, typename Op, int... N>
struct CountTable<Which, T, Op, std::integer_sequence<int, N...>> {
  using Kernel = decltype(Which::template get<1, T, Op>());
  static constexpr Kernel kernel[] = {nullptr, Which::template get<N + 1, T, Op>()...};
};
template <typename Which, typename T, typename Op, int Most>
using CountTableTo = CountTable<Which, T, Op, std::make_integer_sequence<int, Most>>;

// out[i] = op over rows[k][i], k < N, i < n.
template <int N, typename T, typename Op>
void combineRowsFixed(T* out, const T* const* rows, int n) {
  const T* r[N];
  for (int k = 0; k < N; ++k) r[k] = rows[k];
  int i = mapVectors<T, Op>(out, n, [&](auto w, int i) {
    using W = typename decltype(w)::type;
    auto m = W::loadu(r[0] + i);
    for (int k = 1; k < N; ++k) m = Op::template v<W>(m, W::loadu(r[k] + i));
    return m;
  });
  for (; i < n; ++i) {
    T m = ld(r[0] + i);
    for (int k = 1; k < N; ++k) m = Op::s(m, ld(r[k] + i));
    st(out + i, m);
  }
}

struct CombineRows {
  template <int N, typename T, typename Op>
  static constexpr auto get() { return &combineRowsFixed<N, T, Op>; }
};

// out[i] = op over rows[k][i], k < count (count >= 1), i < n: up to eight
// rows at a time.
template <typename T, typename Op>
void combineRows(T* out, const T* const* rows, int count, int n) {
  constexpr int kMost = 8;
  using Table = CountTableTo<CombineRows, T, Op, kMost>;
  Table::kernel[count < kMost ? count : kMost](out, rows, n);
  const T* pair[kMost];
  for (int k = kMost; k < count; k += kMost - 1) {
    const int take = count - k < kMost - 1 ? count - k : kMost - 1;
    pair[0] = out;
    for (int j = 0; j < take; ++j) pair[j + 1] = rows[k + j];
    Table::kernel[take + 1](out, pair, n);
  }
}

// Two output rows of a vertical window that share all rows but the first
// of the upper window and the last of the lower one:
// out0 = op(common, first), out1 = op(common, last), common = op over the
// N rows of `common`.
template <int N, typename T, typename Op>
void combinePair(T* out0, T* out1, const T* const* common, const T* first, const T* last, int n) {
  int i = vectorLoop<T, Op>(n, [&](auto w, int i) {
    using W = typename decltype(w)::type;
    auto m = W::loadu(common[0] + i);
    for (int k = 1; k < N; ++k) m = Op::template v<W>(m, W::loadu(common[k] + i));
    W::storeu(out0 + i, Op::template v<W>(m, W::loadu(first + i)));
    W::storeu(out1 + i, Op::template v<W>(m, W::loadu(last + i)));
  });
  for (; i < n; ++i) {
    T m = ld(common[0] + i);
    for (int k = 1; k < N; ++k) m = Op::s(m, ld(common[k] + i));
    st(out0 + i, Op::s(m, ld(first + i)));
    st(out1 + i, Op::s(m, ld(last + i)));
  }
}

struct CombinePair {
  template <int N, typename T, typename Op>
  static constexpr auto get() { return &combinePair<N, T, Op>; }
};

// Four output rows of a vertical window of N + 3 rows (N >= 0), from the
// N rows all four share, the three rows before them and the three after:
// out[0] = op(common, a0, a1, a2), out[1] = op(common, a1, a2, b0),
// out[2] = op(common, a2, b0, b1), out[3] = op(common, b0, b1, b2).
template <int N, typename T, typename Op>
void combineQuad(T* const* out, const T* const* common, const T* const* a, const T* const* b, int n) {
  int i = vectorLoop<T, Op>(n, [&](auto w, int i) {
    using W = typename decltype(w)::type;
    auto f = [](typename W::Raw x, typename W::Raw y) { return Op::template v<W>(x, y); };
    const auto a2 = W::loadu(a[2] + i), a1 = f(W::loadu(a[1] + i), a2), a0 = f(W::loadu(a[0] + i), a1);
    const auto b0 = W::loadu(b[0] + i), b1 = f(b0, W::loadu(b[1] + i)), b2 = f(b1, W::loadu(b[2] + i));
    if constexpr (N == 0) {
      W::storeu(out[0] + i, a0);
      W::storeu(out[1] + i, f(a1, b0));
      W::storeu(out[2] + i, f(a2, b1));
      W::storeu(out[3] + i, b2);
    } else {
      auto m = W::loadu(common[0] + i);
      for (int k = 1; k < N; ++k) m = f(m, W::loadu(common[k] + i));
      W::storeu(out[0] + i, f(m, a0));
      W::storeu(out[1] + i, f(m, f(a1, b0)));
      W::storeu(out[2] + i, f(m, f(a2, b1)));
      W::storeu(out[3] + i, f(m, b2));
    }
  });
  for (; i < n; ++i) {
    const T a2 = ld(a[2] + i), a1 = Op::s(ld(a[1] + i), a2), a0 = Op::s(ld(a[0] + i), a1);
    const T b0 = ld(b[0] + i), b1 = Op::s(b0, ld(b[1] + i)), b2 = Op::s(b1, ld(b[2] + i));
    T m0 = a0, m1 = Op::s(a1, b0), m2 = Op::s(a2, b1), m3 = b2;
    for (int k = 0; k < N; ++k) {
      const T c = ld(common[k] + i);
      m0 = Op::s(c, m0);
      m1 = Op::s(c, m1);
      m2 = Op::s(c, m2);
      m3 = Op::s(c, m3);
    }
    st(out[0] + i, m0);
    st(out[1] + i, m1);
    st(out[2] + i, m2);
    st(out[3] + i, m3);
  }
}

struct CombineQuad {
  template <int N, typename T, typename Op>
  static constexpr auto get() { return &combineQuad<N - 1, T, Op>; }
};

// One step of the van Herk / Gil-Werman vertical pass: the running prefix of
// the current block (prefixIn null at its first row), and the output row as
// the maximum of the previous block's suffix and that prefix.
template <typename T, typename Op>
void vanHerkStep(T* out, T* prefixOut, const T* prefixIn, const T* h, const T* suffix, int n) {
  int i = vectorLoop<T, Op>(n, [&](auto w, int i) {
    using W = typename decltype(w)::type;
    auto p = W::loadu(h + i);
    if (prefixIn) p = Op::template v<W>(W::loadu(prefixIn + i), p);
    W::storeu(prefixOut + i, p);
    W::storeu(out + i, Op::template v<W>(W::loadu(suffix + i), p));
  });
  for (; i < n; ++i) {
    T p = prefixIn ? Op::s(ld(prefixIn + i), ld(h + i)) : ld(h + i);
    st(prefixOut + i, p);
    st(out + i, Op::s(ld(suffix + i), p));
  }
}

// m[i] = op(m[i], m[i + offset]) for i < n, ascending, so that it may run in
// place over a row whose later part it still reads; `a` and `b` may alias
// `out` in that way only.
template <typename T, typename Op>
void combineForward(T* out, const T* a, const T* b, int n) {
  int i = mapVectors<T, Op>(out, n, [&](auto w, int i) {
    using W = typename decltype(w)::type;
    return Op::template v<W>(W::loadu(a + i), W::loadu(b + i));
  });
  for (; i < n; ++i) st(out + i, Op::s(ld(a + i), ld(b + i)));
}

// out[i] = op over src[i + offsets[k]], k < N, for i < n elements; in
// place (src == out) when no offset is negative.
template <int N, typename T, typename Op>
void windowOffsetsFixed(const T* src, T* out, int n, const int* offsets) {
  int o[N];
  for (int k = 0; k < N; ++k) o[k] = offsets[k];
  int i = mapVectors<T, Op>(out, n, [&](auto w, int i) {
    using W = typename decltype(w)::type;
    auto m = W::loadu(src + i + o[0]);
    for (int k = 1; k < N; ++k) m = Op::template v<W>(m, W::loadu(src + i + o[k]));
    return m;
  });
  for (; i < n; ++i) {
    T m = ld(src + i + o[0]);
    for (int k = 1; k < N; ++k) m = Op::s(m, ld(src + i + o[k]));
    st(out + i, m);
  }
}

// out[i] = op over src[i + k * step], k < K, for i < n elements: the kernel
// specialised for one window width.
template <int K, typename T, typename Op>
void windowFixed(const T* src, T* out, int n, int step) {
  int offsets[K];
  for (int k = 0; k < K; ++k) offsets[k] = k * step;
  windowOffsetsFixed<K, T, Op>(src, out, n, offsets);
}


// out[i] = op(a[i], b[i]) for i < n, descending, so that it may write a
// row of window results `shift` elements further on in the row it reads, as
// long as b - a <= shift.
template <typename T, typename Op>
void combineBackward(T* out, const T* a, const T* b, int n) {
  const int vectors = mapVectors<T, Op, true>(out, n, [&](auto w, int i) {
    using W = typename decltype(w)::type;
    return Op::template v<W>(W::loadu(a + i), W::loadu(b + i));
  });
  for (int i = n - vectors; i > 0; --i) st(out + i - 1, Op::s(ld(a + i - 1), ld(b + i - 1)));
}

struct WindowOffsets {
  template <int N, typename T, typename Op>
  static constexpr auto get() { return &windowOffsetsFixed<N, T, Op>; }
};

// The same for 1 <= count <= 15 (one kernel per count).
template <typename T, typename Op>
void windowOffsets(const T* src, T* out, int n, const int* offsets, int count) {
  CountTableTo<WindowOffsets, T, Op, 15>::kernel[count](src, out, n, offsets);
}

// Window results near the row ends, a vector at a time: out[j] = op over
// R[clamp(j + base + offsets[k])], k < count, for the elements j of whole
// vectors covering [e0, e1) inside a row of rowLen elements, where clamping
// replaces an element before R's first pixel or after its last (R has lenR
// elements, c per pixel) by the same channel of that pixel. Vectors that
// reach past the row end or start are read from two small copies of R's ends
// with a vector's worth of replicated pixels outside them; a vector may also
// compute elements beside [e0, e1) by the same rule. Needs rowLen and lenR of
// at least one vector, and c of 1 to 4.
template <typename T, typename Op>
void windowEnds(const T* R, int lenR, int c, T* out, int rowLen, int e0, int e1, int base, const int* offsets,
                int count) {
  using V = typename Op::V;
  constexpr int L = V::kLanes;
  const int M = (L + 2 * c - 2) / c * c;  // margin: whole pixels, at least L + c - 1 elements
  T head[2 * L + 6], tail[2 * L + 6];     // margin + L elements of R, then L of R + margin
  V::storeu(head + M, V::loadu(R));
  V::storeu(tail, V::loadu(R + lenR - L));
  if (c == 1) {  // the margins in two vectors each
    V::storeu(head, V::set1(ld(R)));
    V::storeu(head + M - L, V::set1(ld(R)));
    V::storeu(tail + L, V::set1(ld(R + lenR - 1)));
    V::storeu(tail + M, V::set1(ld(R + lenR - 1)));
  } else {
    for (int i = 0, ch = 0; i < M; ++i, ch = ch + 1 < c ? ch + 1 : 0) {
      head[i] = ld(R + ch);
      tail[L + i] = ld(R + lenR - c + ch);
    }
  }
  auto vectorAt = [&](int j) {
    // Offsets are whole pixels: every vector read wholly outside R starts
    // at the same channel.
    const int phase = ((j + base) % c + c) % c;
    auto load = [&](int p) {  // the vector at R[p], clamped
      if (p >= 0 && p + L <= lenR) return V::loadu(R + p);
      if (p < 0) return V::loadu(p > -L ? head + M + p : head + phase);
      return V::loadu(p < lenR ? tail + (p - (lenR - L)) : tail + L + phase);
    };
    auto m = load(j + base + offsets[0]);
    for (int k = 1; k < count; ++k) m = Op::v(m, load(j + base + offsets[k]));
    V::storeu(out + j, m);
  };
  if (e1 - e0 < L) {
    vectorAt(e0 + L <= rowLen ? e0 : rowLen - L);
    return;
  }
  for (int j = e0; j + L < e1; j += L) vectorAt(j);
  vectorAt(e1 - L);
}

// Narrower windows leave few results near the row ends, and the running
// extremes make them quicker than the clamped copies of windowEnds.
constexpr int kVectorEnds = 16;

// One row of the horizontal pass: out[x] = op over src[clamp(x + s + k)],
// k < K, x < width, clamping to the row (the replicated border). The caller
// has clipped s and s + K - 1 to [-(width - 1), width - 1]. `temp` (null or a
// row of `width` pixels other than out) speeds up wide windows; out is not
// src.
//
// Widths 1..15 on rows at least twice the width (and up to 8 on any row)
// combine K source pixels per result, one kernel per width; with a scratch
// row, widths of six or more build windows of 4, 16, 64, ... pixels in it,
// and at most nine of them, the last overlapping, make each result. The
// results whose windows reach past a row end come from the same rows with
// clamped positions, as long as the clamped window is at least as wide as
// the built ones and the window is wide; the others, and all of them without
// a scratch row (where the windows double in place in out), are running
// extremes.
template <typename T, typename Op>
void windowRow(const T* src, T* out, int width, int channels, int s, int K, T* temp = nullptr) {
  using V = typename Op::V;
  const int c = channels;
  int xl = s < 0 ? -s : 0;
  int xr = width - K - s + 1;
  if (xr > width) xr = width;
  if (xr < xl) xr = xl;
  int xs = xl, xe = xr;  // running extremes for [0, xs) and [xe, width)
  if (xr > xl) {
    const int n = (xr - xl) * c, pixels = xr - xl + K - 1;
    const T* from = src + (xl + s) * c;  // the source of the first result
    const T* R = nullptr;                // windows of t pixels, from `from` on
    int offsets[15], count = 0, t = 1;
    if ((K <= 8 || (K < 16 && width >= 2 * K)) && !(temp && K >= 6)) {
      R = from;
      for (; count < K; ++count) offsets[count] = count * c;
    } else if (temp) {
      windowFixed<4, T, Op>(from, temp, (pixels - 3) * c, c);
      for (t = 4; K / t > 8; t *= 4) windowFixed<4, T, Op>(temp, temp, (pixels - 4 * t + 1) * c, t * c);
      for (int k = 0; k + t <= K; k += t) offsets[count++] = k * c;
      if (K % t) offsets[count++] = (K - t) * c;
      R = temp;
    } else {
      windowFixed<4, T, Op>(from, out, (pixels - 3) * c, c);
      for (t = 4; 4 * t <= K; t *= 4) windowFixed<4, T, Op>(out, out, (pixels - 4 * t + 1) * c, t * c);
      for (; 2 * t <= K; t *= 2) windowFixed<2, T, Op>(out, out, (pixels - 2 * t + 1) * c, t * c);
      const int d = (K - t) * c, shift = xl * c;  // the second window's offset; where results go
      if (d == 0) {
        if (shift) memmove(out + shift, out, sizeof(T) * size_t(n));
      } else if (shift == 0) {
        combineForward<T, Op>(out, out, out + d, n);
      } else if (d <= shift) {
        combineBackward<T, Op>(out + shift, out, out + d, n);
      } else {
        combineForward<T, Op>(out, out, out + d, n);
        memmove(out + shift, out, sizeof(T) * size_t(n));
      }
    }
    if (R) {
      // The ends first: their scratch copies are read back at once, which
      // is quicker before the row's own stores.
      const int lenR = (pixels - t + 1) * c;
      if (K >= kVectorEnds && width * c >= V::kLanes && lenR >= V::kLanes) {
        // Clamped windows narrower than t would take in pixels outside them.
        const int xv = t > 1 && t - s - K > 0 ? t - s - K : 0;
        const int xw = t > 1 && width - s - t + 1 < width ? width - s - t + 1 : width;
        if (xv < xl) {
          windowEnds<T, Op>(R, lenR, c, out, width * c, xv * c, xl * c, -xl * c, offsets, count);
          xs = xv;
        }
        if (xr < xw) {
          windowEnds<T, Op>(R, lenR, c, out, width * c, xr * c, xw * c, -xl * c, offsets, count);
          xe = xw;
        }
      }
      windowOffsets<T, Op>(R, out + xl * c, n, offsets, count);
    }
  }
  // Running prefix and suffix extremes for the rest.
  for (int ch = 0; ch < c; ++ch) {
    int upTo = 0;
    T run = ld(src + ch);
    for (int x = 0; x < xs; ++x) {
      int b = x + s + K - 1;
      if (b > width - 1) b = width - 1;
      for (; upTo < b; ++upTo) run = Op::s(run, ld(src + (upTo + 1) * c + ch));
      st(out + x * c + ch, run);
    }
    int from = width - 1;
    run = ld(src + from * c + ch);
    for (int x = width - 1; x >= xe; --x) {
      int a = x + s;
      if (a < 0) a = 0;
      for (; from > a; --from) run = Op::s(run, ld(src + (from - 1) * c + ch));
      st(out + x * c + ch, run);
    }
  }
}

// out[x] = op(in[clamp(x + a)], in[clamp(x + b)]), a <= 0 <= b, clamping to
// the row: a window row built from a narrower window row of the same row.
template <typename T, typename Op>
void windowFromTwo(const T* in, T* out, int width, int c, int a, int b) {
  const int x0 = -a < width ? -a : width;
  const int x1 = width - b > x0 ? width - b : x0;
  combineForward<T, Op>(out + x0 * c, in + (x0 + a) * c, in + (x0 + b) * c, (x1 - x0) * c);
  auto clamp = [&](int i) { return i < 0 ? 0 : (i >= width ? width - 1 : i); };
  auto edge = [&](int from, int to) {
    for (int x = from; x < to; ++x)
      for (int ch = 0; ch < c; ++ch)
        st(out + x * c + ch, Op::s(ld(in + clamp(x + a) * c + ch), ld(in + clamp(x + b) * c + ch)));
  };
  edge(0, x0);
  edge(x1, width);
}

// acc[x] = op(acc[x], row(x + shift)) for x < width (or plain assignment when
// `first`), where row(p) is roi[p] inside the row, mem[p] beyond an end that
// is in memory, and the end pixel of roi beyond a replicated end.
template <typename T, typename Op, bool First>
void combineShifted(T* acc, int width, int c, const T* roi, const T* mem, bool memLeft, bool memRight,
                    int shift) {
  auto segment = [&](int x0, int x1, const T* from) {  // from holds row(x0 + shift)
    if (x1 <= x0) return;
    const int n = (x1 - x0) * c;
    if (First)
      memcpy(acc + x0 * c, from, sizeof(T) * size_t(n));
    else
      combineForward<T, Op>(acc + x0 * c, acc + x0 * c, from, n);
  };
  auto edge = [&](int x0, int x1, const T* pixel) {
    for (int x = x0; x < x1; ++x)
      for (int ch = 0; ch < c; ++ch)
        st(acc + x * c + ch, First ? ld(pixel + ch) : Op::s(ld(acc + x * c + ch), ld(pixel + ch)));
  };
  const int leftEnd = shift < 0 ? (-shift < width ? -shift : width) : 0;
  const int rightStart = width - shift < leftEnd ? leftEnd : (width - shift < width ? width - shift : width);
  if (memLeft)
    segment(0, leftEnd, mem + shift * c);
  else
    edge(0, leftEnd, roi);
  segment(leftEnd, rightStart, roi + (leftEnd + shift) * c);
  if (memRight)
    segment(rightStart, width, mem + (rightStart + shift) * c);
  else
    edge(rightStart, width, roi + (width - 1) * c);
}

}  // namespace minmax
}  // namespace zelcv

#endif  // ZELCV_KERNELS_MINMAX_H
