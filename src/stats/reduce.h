// Reductions over the selected pixels of one image or of the difference of
// two: the largest absolute value, the sum of absolute values, the sum of
// squares, the sum with the pixel count, and the extrema with their first
// locations. One scalar definition per statistic serves every layout (one
// channel, or one channel of interest out of three) and the tails of the
// vector rows; the SSE2 rows for one-channel 8u and 32f data give the same
// bits.
//
// Integer data is summed exactly in 64-bit integers. 32f data is summed in
// double precision over sixteen lanes: lane k takes, in raster order, the
// pixels whose column x has x mod 16 == k; with t_k = l_k + l_(k+8), the
// total is ((t0 + t4) + (t2 + t6)) + ((t1 + t5) + (t3 + t7)). Sixteen
// independent chains keep the additions' latency hidden at any vector
// width. Squares of single-precision values are exact in double precision.
#ifndef ZELCV_STATS_REDUCE_H
#define ZELCV_STATS_REDUCE_H

#include <stddef.h>
#include <stdint.h>

#include <cmath>
#include <limits>
#include <type_traits>

#include "kernels/simd.h"

namespace zelcv {
namespace stats {

// What a reduction reads: one image (a) or the difference a - b, an optional
// mask, and the layout: `stride` elements from one pixel to the next, the
// pointers already at the channel of interest.
template <typename T>
struct Source {
  const T* a;
  int aStep;
  const T* b;  // null: one image
  int bStep;
  const uint8_t* mask;  // null: every pixel selected
  int maskStep;
  int stride;
  int width, height;

  const T* rowA(int y) const { return at(a, aStep, y); }
  const T* rowB(int y) const { return at(b, bStep, y); }
  const uint8_t* rowMask(int y) const { return at(mask, maskStep, y); }

  template <typename P>
  static P* at(P* base, int step, int y) {
    return base ? reinterpret_cast<P*>(reinterpret_cast<const char*>(base) + ptrdiff_t(step) * y) : nullptr;
  }
};

enum class Kind { Inf, L1, L2, Sum, SumSq };

constexpr int kLanes = 16;

// The running sums of one statistic. Integer data: exact 64-bit sums; 32f:
// eight double lanes.
template <typename T, bool kFloat = std::is_floating_point<T>::value>
struct Acc {
  uint32_t maxAbs = 0;
  uint64_t sumAbs = 0;  // L1
  uint64_t sumSq = 0;   // L2 and SumSq
  int64_t sum = 0;      // Sum and SumSq
  uint64_t count = 0;

  double total(Kind k) const {
    switch (k) {
      case Kind::Inf: return double(maxAbs);
      case Kind::L1: return double(sumAbs);
      default: return double(sumSq);
    }
  }
  double plainSum() const { return double(sum); }
  double squares() const { return double(sumSq); }
};

inline double reduceLanes(const double* l) {
  double t[8];
  for (int k = 0; k < 8; ++k) t[k] = l[k] + l[k + 8];
  return ((t[0] + t[4]) + (t[2] + t[6])) + ((t[1] + t[5]) + (t[3] + t[7]));
}

template <typename T>
struct Acc<T, true> {
  float maxAbs = 0.0f;
  double lane[kLanes] = {};  // L1 and Sum
  double sq[kLanes] = {};    // L2 and SumSq
  uint64_t count = 0;

  double total(Kind k) const {
    switch (k) {
      case Kind::Inf: return double(maxAbs);
      case Kind::L1: return reduceLanes(lane);
      default: return reduceLanes(sq);
    }
  }
  double plainSum() const { return reduceLanes(lane); }
  double squares() const { return reduceLanes(sq); }
};

// The value a norm sees: |a| or |a - b|, exact for integers; for 32f the
// single-precision difference.
template <typename T>
inline uint32_t magnitude(T a) {
  return a < 0 ? uint32_t(-int32_t(a)) : uint32_t(a);
}
template <typename T>
inline uint32_t magnitude(T a, T b) {
  return a > b ? uint32_t(int32_t(a) - int32_t(b)) : uint32_t(int32_t(b) - int32_t(a));
}

// Pixels [x0, x1) of row y, one by one. Unselected pixels are skipped (the
// vector rows add zeros instead, which leaves every sum as it is: a lane
// never holds -0).
template <Kind K, bool kTwo, bool kMask, typename T>
inline void scalarRow(Acc<T>& acc, const T* a, const T* b, const uint8_t* m, int x0, int x1, int stride) {
  for (int x = x0; x < x1; ++x) {
    if (kMask && !m[x]) continue;
    const T va = a[ptrdiff_t(x) * stride];
    if constexpr (std::is_floating_point<T>::value) {
      const float v = kTwo ? va - b[ptrdiff_t(x) * stride] : va;
      const double d = double(v);
      switch (K) {
        case Kind::Inf: {
          const float m2 = std::fabs(v);
          if (m2 > acc.maxAbs) acc.maxAbs = m2;
          break;
        }
        case Kind::L1: acc.lane[x & 15] += std::fabs(d); break;
        case Kind::L2: acc.sq[x & 15] += d * d; break;
        case Kind::Sum: acc.lane[x & 15] += d; break;
        case Kind::SumSq:
          acc.lane[x & 15] += d;
          acc.sq[x & 15] += d * d;
          break;
      }
    } else {
      switch (K) {
        case Kind::Inf: {
          const uint32_t v = kTwo ? magnitude(va, b[ptrdiff_t(x) * stride]) : magnitude(va);
          if (v > acc.maxAbs) acc.maxAbs = v;
          break;
        }
        case Kind::L1: acc.sumAbs += kTwo ? magnitude(va, b[ptrdiff_t(x) * stride]) : magnitude(va); break;
        case Kind::L2: {
          const uint64_t v = kTwo ? magnitude(va, b[ptrdiff_t(x) * stride]) : magnitude(va);
          acc.sumSq += v * v;
          break;
        }
        case Kind::Sum: acc.sum += int64_t(va); break;
        case Kind::SumSq:
          acc.sum += int64_t(va);
          acc.sumSq += uint64_t(int64_t(va) * int64_t(va));
          break;
      }
    }
    if (kMask && (K == Kind::Sum || K == Kind::SumSq)) ++acc.count;
  }
}

// The vector rows (reduce_sse2.h; the AVX2 ones in reduce_avx2.cpp): they
// handle the columns [0, return value) and leave the rest to scalarRow. The
// generic form handles none.
template <Kind K, bool kTwo, bool kMask, typename T, typename Isa>
struct VectorRow {
  static int run(Acc<T>&, const T*, const T*, const uint8_t*, int) { return 0; }
};

}  // namespace stats
}  // namespace zelcv

#include "stats/reduce_sse2.h"

namespace zelcv {
namespace stats {

// The one loop over the rows of every reduction.
template <Kind K, bool kTwo, bool kMask, typename Isa, typename T>
void reduce(const Source<T>& s, Acc<T>& acc) {
  for (int y = 0; y < s.height; ++y) {
    const T* a = s.rowA(y);
    const T* b = kTwo ? s.rowB(y) : nullptr;
    const uint8_t* m = kMask ? s.rowMask(y) : nullptr;
    int x = 0;
    if (s.stride == 1) x = VectorRow<K, kTwo, kMask, T, Isa>::run(acc, a, b, m, s.width);
    scalarRow<K, kTwo, kMask>(acc, a, b, m, x, s.width, s.stride);
  }
  if (!kMask && (K == Kind::Sum || K == Kind::SumSq)) acc.count = uint64_t(s.width) * uint64_t(s.height);
}

}  // namespace stats
}  // namespace zelcv

#endif  // ZELCV_STATS_REDUCE_H
