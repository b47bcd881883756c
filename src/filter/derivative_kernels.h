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
#include <type_traits>
#include <utility>

#include "filter/border.h"
#include "kernels/dispatch.h"
#include "kernels/simd.h"
#include "zelcv.h"

namespace zelcv {
namespace deriv {

// Integer arithmetic on one value, and on the 16-bit lanes of a vector of
// the instruction set Isa (the SSE2 form here, the AVX2 form in
// derivative_avx2.cpp). Stores narrow to the output types.
struct ScalarOps {
  using V = int;
  static constexpr bool kVector = false;
  static V zero() { return 0; }
  static V set(int c) { return c; }
  static V add(V a, V b) { return a + b; }
  static V sub(V a, V b) { return a - b; }
  template <int C> static V mul(V v) { return v * C; }
  template <int S> static V srai(V v) { return v >> S; }
  static void store16(Zel16s* p, V v) { *p = Zel16s(v); }
  static void storeS8(Zel8s* p, V v) { *p = Zel8s(v < -128 ? -128 : v > 127 ? 127 : v); }
};

template <class Isa> struct VectorOps;

template <> struct VectorOps<simd::Sse2> {
  using V = __m128i;
  static constexpr bool kVector = true;
  static constexpr int kLanes = 8;
  static V zero() { return _mm_setzero_si128(); }
  static V set(int c) { return _mm_set1_epi16(short(c)); }
  static V add(V a, V b) { return _mm_add_epi16(a, b); }
  static V sub(V a, V b) { return _mm_sub_epi16(a, b); }
  template <int C> static V mul(V v) {
    if constexpr (C == 1) return v;
    else if constexpr (C == 2) return _mm_add_epi16(v, v);
    else if constexpr (C == 4) return _mm_slli_epi16(v, 2);
    else if constexpr (C == 8) return _mm_slli_epi16(v, 3);
    else return _mm_mullo_epi16(v, _mm_set1_epi16(C));
  }
  template <int S> static V srai(V v) { return _mm_srai_epi16(v, S); }
  template <int S> static V srli(V v) { return _mm_srli_epi16(v, S); }
  static V mulhiu(V a, V b) { return _mm_mulhi_epu16(a, b); }
  static V load16(const Zel16s* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); }
  // 2 kLanes pixels widened to 16 bits, in order.
  static void loadBytes(const Zel8u* p, V& lo, V& hi) {
    const V v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p));
    lo = _mm_unpacklo_epi8(v, _mm_setzero_si128());
    hi = _mm_unpackhi_epi8(v, _mm_setzero_si128());
  }
  static void store16(Zel16s* p, V v) { _mm_storeu_si128(reinterpret_cast<__m128i*>(p), v); }
  static void storeS8(Zel8s* p, V v) { _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packs_epi16(v, v)); }
  static void storeU8(Zel8u* p, V v) { _mm_storel_epi64(reinterpret_cast<__m128i*>(p), _mm_packus_epi16(v, v)); }
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

// Step 1 by vectors of Isa: a[x] and b[x] for x in [0, width) from the n
// source rows p[0 .. n). Needs width >= 2 VectorOps<Isa>::kLanes; the last
// block overlaps the one before it and rewrites equal values.
template <class Isa, class ColA, class ColB>
void verticalVector(const Zel8u* const* p, int width, Zel16s* a, Zel16s* b) {
  using Ops = VectorOps<Isa>;
  using V = typename Ops::V;
  constexpr int n = ColA::kCount;
  constexpr int block = 2 * Ops::kLanes;
  for (int x0 = 0; x0 < width; x0 += block) {
    const int x = x0 < width - block ? x0 : width - block;
    V lo[n], hi[n];
    for (int i = 0; i < n; ++i) Ops::loadBytes(p[i] + x, lo[i], hi[i]);
    Ops::store16(a + x, ColA::template apply<Ops>(lo));
    Ops::store16(a + x + Ops::kLanes, ColA::template apply<Ops>(hi));
    if constexpr (ColB::kCount > 0) {
      Ops::store16(b + x, ColB::template apply<Ops>(lo));
      Ops::store16(b + x + Ops::kLanes, ColB::template apply<Ops>(hi));
    }
  }
}

// Step 2 by vectors of Isa: sink.template put<Ops>(x, wa, wb) with the
// windows a[x .. x + 2r] and b[x .. x + 2r] (a and b point at column -r) as
// vectors of kLanes lanes, x .. x + kLanes - 1. Needs width >= kLanes;
// blocks may overlap at the end of the row, so a sink must not read what it
// writes.
template <class Isa, int r, bool kTwo, class Sink>
void horizontalVector(const Zel16s* a, const Zel16s* b, int width, const Sink& sink) {
  using Ops = VectorOps<Isa>;
  using V = typename Ops::V;
  constexpr int n = 2 * r + 1;
  for (int x0 = 0; x0 < width; x0 += Ops::kLanes) {
    const int x = x0 < width - Ops::kLanes ? x0 : width - Ops::kLanes;
    V wa[n], wb[n];
    for (int i = 0; i < n; ++i) {
      wa[i] = Ops::load16(a + x + i);
      if constexpr (kTwo) wb[i] = Ops::load16(b + x + i);
    }
    sink.template put<Ops>(x, wa, wb);
  }
}

// Both steps of one row by vectors of Isa (width >= 2 kLanes); the border
// columns of a and b are already in place. A sink names its kernel:
// Sink::ColA, Sink::ColB (or NoTaps), Sink::kRadius.
template <class Isa, class Sink>
void vectorRow(const Zel8u* const* p, int width, Zel16s* a, Zel16s* b, const Sink& sink) {
  constexpr int r = Sink::kRadius;
  constexpr bool kTwo = Sink::ColB::kCount > 0;
  verticalVector<Isa, typename Sink::ColA, typename Sink::ColB>(p, width, a + r, b + r);
  horizontalVector<Isa, r, kTwo>(a, b, width, sink);
}

// One output row of the kernel that `sink` names: the vertical border rule
// picks the source rows, the horizontal rule the border columns, then the
// widest vector form the row is long enough for (every form gives the same
// integers), or plain code on very short rows.
template <class Sink>
void engineRow(const SourceRows& rows, int y, Zel16s* a, Zel16s* b, const Sink& sink) {
  using ColA = typename Sink::ColA;
  using ColB = typename Sink::ColB;
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
  if (width >= 2 * VectorOps<simd::Sse2>::kLanes) {
    withChosenIsa<IsaLevel::Avx2>([&](auto isa) {
      using Isa = typename decltype(isa)::Isa;
      // The AVX2 form reads blocks of 32 pixels.
      if constexpr (!std::is_same<Isa, simd::Sse2>::value) {
        if (width >= 32) return vectorRow<Isa>(p, width, a, b, sink);
      }
      vectorRow<simd::Sse2>(p, width, a, b, sink);
    });
    return;
  }
  for (int x = 0; x < width; ++x) {
    int s[n];
    for (int i = 0; i < n; ++i) s[i] = p[i][x];
    a[r + x] = Zel16s(ColA::template apply<ScalarOps>(s));
    if constexpr (kTwo) b[r + x] = Zel16s(ColB::template apply<ScalarOps>(s));
  }
  if (width >= VectorOps<simd::Sse2>::kLanes) {
    horizontalVector<simd::Sse2, r, kTwo>(a, b, width, sink);
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
