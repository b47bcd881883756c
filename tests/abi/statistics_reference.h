// The masked statistics straight from their definitions: a raster walk over
// the selected pixels of one channel, exact 64-bit sums for integer data and
// the sixteen column lanes of double sums for 32f data. Nothing here follows
// the library's row splitting or vector blocks.
#ifndef ZELCV_TESTS_STATISTICS_REFERENCE_H
#define ZELCV_TESTS_STATISTICS_REFERENCE_H

#include <cmath>
#include <cstdint>
#include <cstring>
#include <type_traits>

#include "support/test_image.h"

namespace zeltest {

struct StatResults {
  double norm[3];      // Inf, L1, L2 of src1
  double normDiff[3];  // of src1 - src2
  double normB[3];     // of src2
  double mean, stdDev;
  double minVal, maxVal;
  ZeliPoint minAt, maxAt;
};

// Sixteen lanes by column mod 16, folded in halves: t_k = l_k + l_(k+8).
inline double laneTotal(const double* l) {
  double t[8];
  for (int k = 0; k < 8; ++k) t[k] = l[k] + l[k + 8];
  return ((t[0] + t[4]) + (t[2] + t[6])) + ((t[1] + t[5]) + (t[3] + t[7]));
}

// Statistics of channel `channel` of a and b where mask (or every pixel when
// null) selects.
template <typename T>
StatResults referenceStats(const TestImage<T>& a, const TestImage<T>& b, const TestImage<uint8_t>* mask,
                           int channel) {
  const bool isFloat = std::is_floating_point<T>::value;
  StatResults r{};
  uint64_t maxAbs[3] = {}, sumAbs[3] = {}, sumSq[3] = {};
  float fmax[3] = {};
  double lanes[3][16] = {}, squares[3][16] = {};
  int64_t sum = 0;
  uint64_t q = 0, n = 0;
  double meanLanes[16] = {}, meanSquares[16] = {};
  bool found = false;
  T lo = T(0), hi = T(0);
  r.minAt = r.maxAt = {-1, -1};
  for (int y = 0; y < a.height(); ++y)
    for (int x = 0; x < a.width(); ++x) {
      if (mask && !mask->at(x, y)) continue;
      const T va = a.at(x, y, channel), vb = b.at(x, y, channel);
      ++n;
      if constexpr (std::is_floating_point<T>::value) {
        const float vals[3] = {va, va - vb, vb};
        for (int k = 0; k < 3; ++k) {
          const double d = vals[k];
          if (std::fabs(vals[k]) > fmax[k]) fmax[k] = std::fabs(vals[k]);
          lanes[k][x % 16] += std::fabs(d);
          squares[k][x % 16] += d * d;
        }
        meanLanes[x % 16] += double(va);
        meanSquares[x % 16] += double(va) * double(va);
      } else {
        const int64_t vals[3] = {int64_t(va), int64_t(va) - int64_t(vb), int64_t(vb)};
        for (int k = 0; k < 3; ++k) {
          const uint64_t m = uint64_t(vals[k] < 0 ? -vals[k] : vals[k]);
          if (m > maxAbs[k]) maxAbs[k] = m;
          sumAbs[k] += m;
          sumSq[k] += m * m;
        }
        sum += int64_t(va);
        q += uint64_t(int64_t(va) * int64_t(va));
      }
      if (va != va) continue;  // NaN: never an extremum
      if (!found || va < lo) {
        lo = va;
        r.minAt = {x, y};
      }
      if (!found || va > hi) {
        hi = va;
        r.maxAt = {x, y};
      }
      found = true;
    }
  double* outs[3] = {r.norm, r.normDiff, r.normB};
  for (int k = 0; k < 3; ++k) {
    if (isFloat) {
      outs[k][0] = fmax[k];
      outs[k][1] = laneTotal(lanes[k]);
      outs[k][2] = std::sqrt(laneTotal(squares[k]));
    } else {
      outs[k][0] = double(maxAbs[k]);
      outs[k][1] = double(sumAbs[k]);
      outs[k][2] = std::sqrt(double(sumSq[k]));
    }
  }
  if (n) {
    const double S = isFloat ? laneTotal(meanLanes) : double(sum);
    const double Q = isFloat ? laneTotal(meanSquares) : double(q);
    r.mean = S / double(n);
    const double var = Q / double(n) - r.mean * r.mean;
    r.stdDev = var > 0 ? std::sqrt(var) : 0.0;
  }
  r.minVal = found ? double(lo) : 0.0;
  r.maxVal = found ? double(hi) : 0.0;
  return r;
}

// The relative norm with the zero-divisor rule.
inline double relativeNorm(double num, double den) {
  if (den != 0) return num / den;
  if (num > 0) return HUGE_VAL;
  if (num < 0) return -HUGE_VAL;
  const uint64_t bits = 0xFFF8000000000000ull;
  double v;
  std::memcpy(&v, &bits, 8);
  return v;
}

inline bool sameBits(double a, double b) { return std::memcmp(&a, &b, sizeof a) == 0; }

}  // namespace zeltest

#endif  // ZELCV_TESTS_STATISTICS_REFERENCE_H
