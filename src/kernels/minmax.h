// Row kernels for running maxima and minima, shared by the morphology
// families: element-wise combination of rows, horizontal window maxima (one
// kernel per width 1..15 plus a generic doubling kernel whose cost grows with
// the logarithm of the width), and shifted combination with replicated or
// in-memory row ends. Elements of a multi-channel row are independent; a
// window step is one pixel, that is `channels` elements.
#ifndef ZELCV_KERNELS_MINMAX_H
#define ZELCV_KERNELS_MINMAX_H

#include <string.h>

#include <utility>

#include "kernels/simd.h"

namespace zelcv {
namespace minmax {

// Scalar and vector operations agree on every ordered value: the scalar forms
// repeat what the vector instructions do (first operand when it wins).
template <typename T>
struct MaxOp {
  using V = simd::Vec<T>;
  static T s(T a, T b) { return a > b ? a : b; }
  static typename V::Raw v(typename V::Raw a, typename V::Raw b) { return V::max(a, b); }
};
template <typename T>
struct MinOp {
  using V = simd::Vec<T>;
  static T s(T a, T b) { return a < b ? a : b; }
  static typename V::Raw v(typename V::Raw a, typename V::Raw b) { return V::min(a, b); }
};

// out[i] = op over rows[k][i], k < count (count >= 1), i < n.
template <typename T, typename Op>
void combineRows(T* out, const T* const* rows, int count, int n) {
  using V = simd::Vec<T>;
  int i = 0;
  for (; i + V::kLanes <= n; i += V::kLanes) {
    auto m = V::loadu(rows[0] + i);
    for (int k = 1; k < count; ++k) m = Op::v(m, V::loadu(rows[k] + i));
    V::storeu(out + i, m);
  }
  for (; i < n; ++i) {
    T m = rows[0][i];
    for (int k = 1; k < count; ++k) m = Op::s(m, rows[k][i]);
    out[i] = m;
  }
}

// The same for a count fixed at compile time (the short vertical windows).
template <int N, typename T, typename Op>
void combineRowsFixed(T* out, const T* const* rows, int n) {
  using V = simd::Vec<T>;
  int i = 0;
  for (; i + V::kLanes <= n; i += V::kLanes) {
    auto m = V::loadu(rows[0] + i);
    for (int k = 1; k < N; ++k) m = Op::v(m, V::loadu(rows[k] + i));
    V::storeu(out + i, m);
  }
  for (; i < n; ++i) {
    T m = rows[0][i];
    for (int k = 1; k < N; ++k) m = Op::s(m, rows[k][i]);
    out[i] = m;
  }
}

// m[i] = op(m[i], m[i + offset]) for i < n, ascending, so that it may run in
// place over a row whose later part it still reads; `a` and `b` may alias
// `out` in that way only.
template <typename T, typename Op>
void combineForward(T* out, const T* a, const T* b, int n) {
  using V = simd::Vec<T>;
  int i = 0;
  for (; i + V::kLanes <= n; i += V::kLanes) V::storeu(out + i, Op::v(V::loadu(a + i), V::loadu(b + i)));
  for (; i < n; ++i) out[i] = Op::s(a[i], b[i]);
}

// out[i] = op over src[i + k * step], k < K, for i < n elements: the kernel
// specialised for one window width.
template <int K, typename T, typename Op>
void windowFixed(const T* src, T* out, int n, int step) {
  using V = simd::Vec<T>;
  int i = 0;
  for (; i + V::kLanes <= n; i += V::kLanes) {
    auto m = V::loadu(src + i);
    for (int k = 1; k < K; ++k) m = Op::v(m, V::loadu(src + i + k * step));
    V::storeu(out + i, m);
  }
  for (; i < n; ++i) {
    T m = src[i];
    for (int k = 1; k < K; ++k) m = Op::s(m, src[i + k * step]);
    out[i] = m;
  }
}

template <typename T, typename Op>
using WindowKernel = void (*)(const T*, T*, int, int);

template <typename T, typename Op, typename Widths>
struct WindowTable;
template <typename T, typename Op, int... K>
struct WindowTable<T, Op, std::integer_sequence<int, K...>> {
  static constexpr WindowKernel<T, Op> kernel[] = {nullptr, &windowFixed<K + 1, T, Op>...};
};

// Generic window of K pixels over `pixels` source pixels (K <= pixels):
// writes pixels - K + 1 window results to out[0..] by doubling: windows of
// 2, 4, 8, ... pixels built in place in `out`, then two overlapping ones.
template <typename T, typename Op>
void windowDoubling(const T* src, T* out, int pixels, int K, int channels) {
  const int c = channels;
  if (K == 1) {
    memcpy(out, src, sizeof(T) * size_t(pixels) * c);
    return;
  }
  combineForward<T, Op>(out, src, src + c, (pixels - 1) * c);
  int t = 2;
  for (; 2 * t <= K; t *= 2) combineForward<T, Op>(out, out, out + t * c, (pixels - 2 * t + 1) * c);
  if (K > t) combineForward<T, Op>(out, out, out + (K - t) * c, (pixels - K + 1) * c);
}

// One row of the horizontal pass: out[x] = op over src[clamp(x + s + k)],
// k < K, x < width, clamping to the row (the replicated border). The caller
// has clipped s and s + K - 1 to [-(width - 1), width - 1].
template <typename T, typename Op>
void windowRow(const T* src, T* out, int width, int channels, int s, int K) {
  const int c = channels;
  int xl = s < 0 ? -s : 0;
  int xr = width - K - s + 1;
  if (xr > width) xr = width;
  if (xr < xl) xr = xl;
  if (xr > xl) {
    const int n = xr - xl;
    if (K < 16 && width >= 2 * K) {
      WindowTable<T, Op, std::make_integer_sequence<int, 15>>::kernel[K](src + (xl + s) * c, out + xl * c, n * c, c);
    } else {
      windowDoubling<T, Op>(src + (xl + s) * c, out, n + K - 1, K, c);
      if (xl) memmove(out + xl * c, out, sizeof(T) * size_t(n) * c);
    }
  }
  // Windows that reach past a row end: running prefix and suffix extremes.
  for (int ch = 0; ch < c; ++ch) {
    int upTo = 0;
    T run = src[ch];
    for (int x = 0; x < xl; ++x) {
      int b = x + s + K - 1;
      if (b > width - 1) b = width - 1;
      for (; upTo < b; ++upTo) run = Op::s(run, src[(upTo + 1) * c + ch]);
      out[x * c + ch] = run;
    }
    int from = width - 1;
    run = src[from * c + ch];
    for (int x = width - 1; x >= xr; --x) {
      int a = x + s;
      if (a < 0) a = 0;
      for (; from > a; --from) run = Op::s(run, src[(from - 1) * c + ch]);
      out[x * c + ch] = run;
    }
  }
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
      for (int ch = 0; ch < c; ++ch) acc[x * c + ch] = First ? pixel[ch] : Op::s(acc[x * c + ch], pixel[ch]);
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
