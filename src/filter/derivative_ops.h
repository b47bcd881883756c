// The kernels, output conversions and sinks of the integer derivative engine
// (derivative_kernels.h): what the exported 8-bit derivative and box filters
// and the gradient rows of derivative.h compute. Every sink is listed once
// below, so that the AVX2 file can build its forms of their rows.
#ifndef ZELCV_FILTER_DERIVATIVE_OPS_H
#define ZELCV_FILTER_DERIVATIVE_OPS_H

#include <stdint.h>

#include "filter/derivative_kernels.h"
#include "kernels/simd.h"
#include "zelcv.h"

namespace zelcv {
namespace deriv {

// ---- output conversions ------------------------------------------------------

struct To16s {  // the exact sum
  using T = Zel16s;
  template <class Ops> static void store(T* p, typename Ops::V v) { Ops::store16(p, v); }
};

// floor(v / 2^S + 1/2), saturated to -128 .. 127. |v| + 2^(S-1) stays inside
// 16 bits for every kernel.
template <int S>
struct To8s {
  using T = Zel8s;
  template <class Ops> static void store(T* p, typename Ops::V v) {
    Ops::storeS8(p, Ops::template srai<S>(Ops::add(v, Ops::set(1 << (S - 1)))));
  }
};

// (v + N/2) / N for 0 <= v <= 255 N: the mean of N pixels rounded to nearest
// (N is odd, so no exact halves). The vector form multiplies by M / 2^(16+S),
// which equals the division over that range (checked at compile time).
template <int N, int M, int S>
struct Mean {
  using T = Zel8u;
  static constexpr bool exact() {
    for (int v = 0; v <= 255 * N + N / 2; ++v)
      if ((v * int64_t(M)) >> (16 + S) != v / N) return false;
    return true;
  }
  static_assert(exact(), "the multiplier divides exactly");
  template <class Ops> static void store(T* p, typename Ops::V v) {
    if constexpr (Ops::kVector) {
      const typename Ops::V q = Ops::add(v, Ops::set(N / 2));
      Ops::storeU8(p, Ops::template srli<S>(Ops::mulhiu(q, Ops::set(M))));
    } else {
      *p = T((v + N / 2) / N);
    }
  }
};
using Mean9 = Mean<9, 58255, 3>;
using Mean25 = Mean<25, 41944, 4>;

// ---- kernels -------------------------------------------------------------------

// out = RowA(column values of ColA) + RowB(column values of ColB).
template <class ColA, class RowA, class ColB = NoTaps, class RowB = NoTaps>
struct Kernel {
  using CA = ColA;
  using CB = ColB;
  using RA = RowA;
  using RB = RowB;
  static constexpr int kRadius = ColA::kRadius;
  static constexpr bool kTwo = ColB::kCount > 0;
};

using NegFirst3 = Taps<1, 0, -1>;
using NegFirst5 = Taps<1, 2, 0, -2, -1>;

// Each operation's 3x3 and 5x5 kernel and the shift of its 8s result.
struct SobelHoriz {
  using K3 = Kernel<First3, Smooth3>;
  using K5 = Kernel<First5, Smooth5>;
  static constexpr int kShift3 = 3, kShift5 = 7;
};
struct SobelVert {
  using K3 = Kernel<Smooth3, First3>;
  using K5 = Kernel<Smooth5, First5>;
  static constexpr int kShift3 = 3, kShift5 = 7;
};
struct SobelNegVert {
  using K3 = Kernel<Smooth3, NegFirst3>;
  using K5 = Kernel<Smooth5, NegFirst5>;
  static constexpr int kShift3 = 3, kShift5 = 7;
};
struct SobelHorizSecond {
  using K3 = Kernel<Second3, Smooth3>;
  using K5 = Kernel<Second5, Smooth5>;
  static constexpr int kShift3 = 4, kShift5 = 6;
};
struct SobelVertSecond {
  using K3 = Kernel<Smooth3, Second3>;
  using K5 = Kernel<Smooth5, Second5>;
  static constexpr int kShift3 = 4, kShift5 = 6;
};
struct SobelCross {
  using K3 = Kernel<First3, First3>;
  using K5 = Kernel<First5, First5>;
  static constexpr int kShift3 = 2, kShift5 = 6;
};
struct ScharrHoriz {
  using K3 = Kernel<First3, ScharrSmooth3>;
  using K5 = void;  // 3x3 only
  static constexpr int kShift3 = 5;
};
struct ScharrVert {
  using K3 = Kernel<ScharrSmooth3, First3>;
  using K5 = void;
  static constexpr int kShift3 = 5;
};
struct Laplacian {
  using K3 = Kernel<Smooth3, Second3, Second3, Smooth3>;
  using K5 = Kernel<Smooth5, Second5, Second5, Smooth5>;
  static constexpr int kShift3 = 4, kShift5 = 7;
};
using Box3x3 = Kernel<Box3, Box3>;
using Box5x5 = Kernel<Box5, Box5>;

// ---- sinks -------------------------------------------------------------------

// One kernel's output, converted by Out.
template <class K, class Out>
struct FilterSink {
  using ColA = typename K::CA;
  using ColB = typename K::CB;
  static constexpr int kRadius = K::kRadius;
  typename Out::T* out;
  template <class Ops>
  void put(int x, const typename Ops::V* a, const typename Ops::V* b) const {
    typename Ops::V v = K::RA::template apply<Ops>(a);
    if constexpr (K::kTwo) v = Ops::add(v, K::RB::template apply<Ops>(b));
    else (void)b;
    Out::template store<Ops>(out + x, v);
  }
};

// Both first derivatives at once: the column sums (smoothing taps) feed dx,
// the column differences (derivative taps) feed dy.
template <class Smooth, class First>
struct GradientSink {
  using ColA = Smooth;
  using ColB = First;
  static constexpr int kRadius = Smooth::kRadius;
  Zel16s* dx;
  Zel16s* dy;
  template <class Ops>
  void put(int x, const typename Ops::V* a, const typename Ops::V* b) const {
    Ops::store16(dx + x, First::template apply<Ops>(a));
    Ops::store16(dy + x, Smooth::template apply<Ops>(b));
  }
};

// Every sink the library runs, X(sink type).
#define ZELCV_DERIV_OP_SINKS(X, Op, K, shift) \
  X(FilterSink<Op::K, To16s>)                  \
  X(FilterSink<Op::K, To8s<Op::shift>>)
#define ZELCV_DERIV_SINKS(X)                                \
  ZELCV_DERIV_OP_SINKS(X, SobelHoriz, K3, kShift3)          \
  ZELCV_DERIV_OP_SINKS(X, SobelHoriz, K5, kShift5)          \
  ZELCV_DERIV_OP_SINKS(X, SobelVert, K3, kShift3)           \
  ZELCV_DERIV_OP_SINKS(X, SobelVert, K5, kShift5)           \
  ZELCV_DERIV_OP_SINKS(X, SobelNegVert, K3, kShift3)        \
  ZELCV_DERIV_OP_SINKS(X, SobelNegVert, K5, kShift5)        \
  ZELCV_DERIV_OP_SINKS(X, SobelHorizSecond, K3, kShift3)    \
  ZELCV_DERIV_OP_SINKS(X, SobelHorizSecond, K5, kShift5)    \
  ZELCV_DERIV_OP_SINKS(X, SobelVertSecond, K3, kShift3)     \
  ZELCV_DERIV_OP_SINKS(X, SobelVertSecond, K5, kShift5)     \
  ZELCV_DERIV_OP_SINKS(X, SobelCross, K3, kShift3)          \
  ZELCV_DERIV_OP_SINKS(X, SobelCross, K5, kShift5)          \
  ZELCV_DERIV_OP_SINKS(X, ScharrHoriz, K3, kShift3)         \
  ZELCV_DERIV_OP_SINKS(X, ScharrVert, K3, kShift3)          \
  ZELCV_DERIV_OP_SINKS(X, Laplacian, K3, kShift3)           \
  ZELCV_DERIV_OP_SINKS(X, Laplacian, K5, kShift5)           \
  X(FilterSink<Box3x3, Mean9>)                              \
  X(FilterSink<Box5x5, Mean25>)                             \
  X(GradientSink<Smooth3, First3>)                          \
  X(GradientSink<ScharrSmooth3, First3>)                    \
  X(GradientSink<Smooth5, First5>)

#define ZELCV_DERIV_ROW(Isa, ...) \
  void vectorRow<Isa, __VA_ARGS__>(const Zel8u* const*, int, Zel16s*, Zel16s*, const __VA_ARGS__&);
#define ZELCV_DERIV_EXTERN_AVX2(...) extern template ZELCV_DERIV_ROW(avx2::Isa, __VA_ARGS__)
// Built in derivative_avx2.cpp.
ZELCV_DERIV_SINKS(ZELCV_DERIV_EXTERN_AVX2)

}  // namespace deriv
}  // namespace zelcv

#endif  // ZELCV_FILTER_DERIVATIVE_OPS_H
