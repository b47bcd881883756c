// The one integer engine of the derivative and smoothing filters of 8-bit
// images (Sobel, Scharr, Laplacian, box lowpass) and of the Canny detector.
// A kernel is one or two separable terms with small integer taps known at
// compile time. Each output row is made in two steps:
//   1. vertical: for every column x in [-r, width + r), the column taps A
//      (and B) applied to the 2r + 1 source rows y - r .. y + r;
//   2. horizontal: a sink combines the 2r + 1 neighbouring column values of
//      A (and B) into the output, and stores it.
// Every intermediate value of every kernel fits in 16 bits (the largest is
// the 5x5 Laplacian, 56 x 255 = 14280 in magnitude), and 16-bit additions are
// exact modulo 2^16, so the vector and scalar paths give the same integers
// whatever the order of the additions.
#ifndef ZELCV_FILTER_DERIVATIVE_KERNELS_H
#define ZELCV_FILTER_DERIVATIVE_KERNELS_H

#include <emmintrin.h>
#include <stddef.h>
#include <stdint.h>

#include <algorithm>
#include <utility>

#include "filter/border.h"
#include "zelcv.h"

namespace zelcv {
namespace deriv {

// Integer arithmetic on one value and on eight 16-bit lanes.
struct ScalarOps {
  using V = int;
  static V zero() { return 0; }
  static V add(V a, V b) { return a + b; }
  static V sub(V a, V b) { return a - b; }
  template <int C> static V mul(V v) { return v * C; }
};

struct VectorOps {
  using V = __m128i;
  static V zero() { return _mm_setzero_si128(); }
  static V add(V a, V b) { return _mm_add_epi16(a, b); }
  static V sub(V a, V b) { return _mm_sub_epi16(a, b); }
  template <int C> static V mul(V v) {
    if constexpr (C == 1) return v;
    else if constexpr (C == 2) return _mm_add_epi16(v, v);
    else if constexpr (C == 4) return _mm_slli_epi16(v, 2);
    else if constexpr (C == 8) return _mm_slli_epi16(v, 3);
    else return _mm_mullo_epi16(v, _mm_set1_epi16(C));
  }
};

// Taps applied without reversal: tap 0 multiplies s[0], the leftmost (or
// topmost) sample of the window. Zero taps cost nothing.
template <int... T>
struct Taps {
  static constexpr int kCount = sizeof...(T);
  static constexpr int kRadius = (kCount - 1) / 2;
  static constexpr int kTaps[kCount] = {T...};

  template <class Ops>
  static typename Ops::V apply(const typename Ops::V* s) {
    return applyAll<Ops>(s, std::make_index_sequence<kCount>{});
  }

 private:
  template <class Ops, int C>
  static typename Ops::V term(typename Ops::V acc, typename Ops::V v) {
    if constexpr (C == 0) return acc;
    else if constexpr (C > 0) return Ops::add(acc, Ops::template mul<C>(v));
    else return Ops::sub(acc, Ops::template mul<-C>(v));
  }
  template <class Ops, size_t... I>
  static typename Ops::V applyAll(const typename Ops::V* s, std::index_sequence<I...>) {
    typename Ops::V acc = Ops::zero();
    ((acc = term<Ops, kTaps[I]>(acc, s[I])), ...);
    return acc;
  }
};

// The one-dimensional taps of the library's derivative kernels.
using Smooth3 = Taps<1, 2, 1>;
using Smooth5 = Taps<1, 4, 6, 4, 1>;
using ScharrSmooth3 = Taps<3, 10, 3>;
using First3 = Taps<-1, 0, 1>;
using First5 = Taps<-1, -2, 0, 2, 1>;
using Second3 = Taps<1, -2, 1>;
using Second5 = Taps<1, 0, -2, 0, 1>;
using Box3 = Taps<1, 1, 1>;
using Box5 = Taps<1, 1, 1, 1, 1>;

// Which source row stands for row y (any integer): the vertical border rule.
// Rows beyond a side in memory are read at their natural address; the
// constant kind gives a row of the border value; the other kinds pick a row
// of the image with the shared border index.
struct SourceRows {
  const Zel8u* src;
  int srcStep;
  ZeliSize roi;
  ZeliBorderType border;
  Zel8u borderValue;
  const Zel8u* constantRow;  // width pixels of borderValue (constant kind)

  const Zel8u* row(int y) const {
    if (y < 0 ? inMemoryTop(border) : y >= roi.height ? inMemoryBottom(border) : true)
      return src + ptrdiff_t(y) * srcStep;
    const int kind = borderKind(border);
    if (kind == zelBorderConstant) return constantRow;
    int index = borderIndex(y, roi.height, kind);
    index = std::min(std::max(index, 0), roi.height - 1);
    return src + ptrdiff_t(index) * srcStep;
  }
};

// A term that is not there.
struct NoTaps {
  static constexpr int kCount = 0;
};

// Step 1 for image row y: a[x + r] and b[x + r] for x in [-r, width + r),
// r the radius of ColA (ColB has the same size or is NoTaps).
template <class ColA, class ColB>
void verticalPass(const SourceRows& rows, int y, Zel16s* a, Zel16s* b) {
  constexpr int r = ColA::kRadius;
  constexpr int n = 2 * r + 1;
  constexpr bool kTwo = ColB::kCount > 0;
  const int width = rows.roi.width;
  const Zel8u* p[n];
  Zel8u left[n][r], right[n][r];
  for (int i = 0; i < n; ++i) {
    p[i] = rows.row(y - r + i);
    for (int j = 0; j < r; ++j) left[i][j] = right[i][j] = rows.borderValue;
    if (p[i] != rows.constantRow)
      extendRowBorder(p[i], width, 1, rows.border, &rows.borderValue, r, r, left[i], right[i]);
  }
  // The border columns, from the pixels the horizontal rule gives.
  for (int j = 0; j < r; ++j) {
    int sl[n], sr[n];
    for (int i = 0; i < n; ++i) {
      sl[i] = left[i][j];
      sr[i] = right[i][j];
    }
    a[j] = Zel16s(ColA::template apply<ScalarOps>(sl));
    a[r + width + j] = Zel16s(ColA::template apply<ScalarOps>(sr));
    if constexpr (kTwo) {
      b[j] = Zel16s(ColB::template apply<ScalarOps>(sl));
      b[r + width + j] = Zel16s(ColB::template apply<ScalarOps>(sr));
    }
  }
  a += r;
  if constexpr (kTwo) b += r;
  if (width >= 16) {
    const __m128i zero = _mm_setzero_si128();
    // The last block overlaps the one before it; it rewrites equal values.
    for (int x0 = 0; x0 < width; x0 += 16) {
      const int x = std::min(x0, width - 16);
      __m128i lo[n], hi[n];
      for (int i = 0; i < n; ++i) {
        const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p[i] + x));
        lo[i] = _mm_unpacklo_epi8(v, zero);
        hi[i] = _mm_unpackhi_epi8(v, zero);
      }
      _mm_storeu_si128(reinterpret_cast<__m128i*>(a + x), ColA::template apply<VectorOps>(lo));
      _mm_storeu_si128(reinterpret_cast<__m128i*>(a + x + 8), ColA::template apply<VectorOps>(hi));
      if constexpr (kTwo) {
        _mm_storeu_si128(reinterpret_cast<__m128i*>(b + x), ColB::template apply<VectorOps>(lo));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(b + x + 8), ColB::template apply<VectorOps>(hi));
      }
    }
    return;
  }
  for (int x = 0; x < width; ++x) {
    int s[n];
    for (int i = 0; i < n; ++i) s[i] = p[i][x];
    a[x] = Zel16s(ColA::template apply<ScalarOps>(s));
    if constexpr (kTwo) b[x] = Zel16s(ColB::template apply<ScalarOps>(s));
  }
}

// Step 2: sink.template put<Ops>(x, wa, wb) with the windows a[x .. x + 2r]
// and b[x .. x + 2r] (as values or as vectors of eight lanes, x .. x + 7).
// The sink's vector put stores eight outputs; blocks may overlap at the end
// of the row, so a sink must not read what it writes.
template <int r, bool kTwo, class Sink>
void horizontalPass(const Zel16s* a, const Zel16s* b, int width, const Sink& sink) {
  constexpr int n = 2 * r + 1;
  if (width >= 8) {
    for (int x0 = 0; x0 < width; x0 += 8) {
      const int x = std::min(x0, width - 8);
      __m128i wa[n], wb[n];
      for (int i = 0; i < n; ++i) {
        wa[i] = _mm_loadu_si128(reinterpret_cast<const __m128i*>(a + x + i));
        if constexpr (kTwo) wb[i] = _mm_loadu_si128(reinterpret_cast<const __m128i*>(b + x + i));
      }
      sink.template put<VectorOps>(x, wa, wb);
    }
    return;
  }
  for (int x = 0; x < width; ++x) {
    int wa[n], wb[n];
    for (int i = 0; i < n; ++i) {
      wa[i] = a[x + i];
      wb[i] = kTwo ? b[x + i] : 0;
    }
    sink.template put<ScalarOps>(x, wa, wb);
  }
}

// Scratch of one engine: the two column rows of width + 2r values.
inline size_t scratchColumns(int width, int radius) { return size_t(width) + 2 * size_t(radius); }

}  // namespace deriv
}  // namespace zelcv

#endif  // ZELCV_FILTER_DERIVATIVE_KERNELS_H
