// The members of the separable pipeline behind one calling shape each, plus
// a plain scalar reference of their arithmetic, for the typed tests.
#ifndef ZELCV_TESTS_SEPFILTER_MEMBERS_H
#define ZELCV_TESTS_SEPFILTER_MEMBERS_H

#include <cmath>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "zelcv.h"

namespace zeltest {
namespace sepref {

// How a member forms and converts its sums.
enum class Arith {
  floatTrunc,  // taps x (1/divisor) in float, float sum, clamp, truncate
  floatRound,  // the same, rounded to nearest even
  low,         // integer sum, fixed-point 1/divisor
  rowDouble,   // 32f row: double sum, one rounding to float
  colFloat     // 32f column: float sum
};

// Which divisors a member refuses with -5.
enum class DivisorRule { nonZero, positive, unchecked, none };

template <typename D>
D saturateTo(double v) {
  if (v < double(std::numeric_limits<D>::lowest())) return std::numeric_limits<D>::lowest();
  if (v > double(std::numeric_limits<D>::max())) return std::numeric_limits<D>::max();
  return D(v);
}

// The pixel sum of one output element for element sources p[0..K-1].
template <typename D, typename Tap, typename S>
D combine(Arith arith, const Tap* kernel, const S* p, int count, int divisor) {
  if (arith == Arith::rowDouble) {
    double acc = double(kernel[0]) * double(p[0]);
    for (int k = 1; k < count; ++k) acc = acc + double(kernel[k]) * double(p[k]);
    return D(acc);
  }
  if (arith == Arith::colFloat) {
    float acc = float(kernel[0]) * float(p[0]);
    for (int k = 1; k < count; ++k) acc = acc + float(kernel[k]) * float(p[k]);
    return D(acc);
  }
  if (arith == Arith::low) {
    int64_t exact = 0;
    for (int k = 0; k < count; ++k) exact += int64_t(kernel[k]) * int64_t(p[k]);
    // The sum lives in 32 bits: keep its low 32 bits, signed.
    int64_t sum = int64_t(int32_t(uint32_t(uint64_t(exact))));
    if (divisor == 1) return saturateTo<D>(double(sum));
    int64_t r = int16_t(int(16384.0f / float(divisor)));
    int64_t product = sum * r;
    int64_t q = product >= 0 ? product / 16384 : -((-product + 16383) / 16384);  // floor
    return saturateTo<D>(double(q));
  }
  // Single-precision contract: scale computed once, taps scaled, sum in tap
  // order starting from the first product.
  const float scale = 1.0f / float(divisor);
  float acc = (float(kernel[0]) * scale) * float(p[0]);
  for (int k = 1; k < count; ++k) acc = acc + (float(kernel[k]) * scale) * float(p[k]);
  const float lo = float(std::numeric_limits<D>::lowest()), hi = float(std::numeric_limits<D>::max());
  if (!(acc > lo)) acc = lo;  // NaN goes to the low end, as the vector clamp does
  if (acc > hi) acc = hi;
  return D(arith == Arith::floatRound ? std::nearbyint(acc) : std::trunc(acc));
}

// The exact rational value of the same sum, for checking the reference.
template <typename Tap, typename S>
double exactValue(const Tap* kernel, const S* p, int count, int divisor) {
  double acc = 0;
  for (int k = 0; k < count; ++k) acc += double(kernel[k]) * double(p[k]);
  return acc / divisor;
}

}  // namespace sepref

// What both passes' members declare about themselves.
#define ZELTEST_MEMBER_TRAITS(S_, D_, Tap_, channels_, arith_, rule_, suffix) \
  using S = S_;                                                              \
  using D = D_;                                                              \
  using Tap = Tap_;                                                          \
  static constexpr int channels = channels_;                                 \
  static constexpr sepref::Arith arith = sepref::Arith::arith_;              \
  static constexpr sepref::DivisorRule rule = sepref::DivisorRule::rule_;    \
  static constexpr const char* name = #suffix;

// Row members behind one shape: a null `value` for a one-channel member
// passes 0 (the value is by value there).
#define ZELTEST_ROW_MEMBER(Name, S_, D_, Tap_, channels_, arith_, rule_, suffix, valueArg, divArg)        \
  struct Name {                                                                                              \
    ZELTEST_MEMBER_TRAITS(S_, D_, Tap_, channels_, arith_, rule_, suffix)                                    \
    static ZelStatus call(const S* src, int srcStep, D** dst, ZeliSize roi, const Tap* kernel, int size,    \
                          int anchor, ZeliBorderType border, const S* value, int divisor, Zel8u* buffer) {  \
      (void)divisor;                                                                                         \
      return zeliFilterRowBorderPipeline_##suffix(src, srcStep, dst, roi, kernel, size, anchor, border,     \
                                                  valueArg, divArg buffer);                                  \
    }                                                                                                        \
    static ZelStatus bufferSize(ZeliSize roi, int size, int* bytes) {                                        \
      return zeliFilterRowBorderPipelineGetBufferSize_##suffix(roi, size, bytes);                            \
    }                                                                                                        \
  }

#define ZELTEST_C1_VALUE (value ? *value : S())
#define ZELTEST_C3_VALUE value
#define ZELTEST_DIV divisor,
#define ZELTEST_NODIV

ZELTEST_ROW_MEMBER(Row16sC1, Zel16s, Zel16s, Zel16s, 1, floatTrunc, nonZero, 16s_C1R, ZELTEST_C1_VALUE, ZELTEST_DIV);
ZELTEST_ROW_MEMBER(Row16sC3, Zel16s, Zel16s, Zel16s, 3, floatTrunc, nonZero, 16s_C3R, ZELTEST_C3_VALUE, ZELTEST_DIV);
ZELTEST_ROW_MEMBER(Row16uC1, Zel16u, Zel16u, Zel16s, 1, floatTrunc, positive, 16u_C1R, ZELTEST_C1_VALUE, ZELTEST_DIV);
ZELTEST_ROW_MEMBER(Row16uC3, Zel16u, Zel16u, Zel16s, 3, floatTrunc, positive, 16u_C3R, ZELTEST_C3_VALUE, ZELTEST_DIV);
ZELTEST_ROW_MEMBER(Row32fC1, Zel32f, Zel32f, Zel32f, 1, rowDouble, none, 32f_C1R, ZELTEST_C1_VALUE, ZELTEST_NODIV);
ZELTEST_ROW_MEMBER(Row32fC3, Zel32f, Zel32f, Zel32f, 3, rowDouble, none, 32f_C3R, ZELTEST_C3_VALUE, ZELTEST_NODIV);
ZELTEST_ROW_MEMBER(Row8u16sC1, Zel8u, Zel16s, Zel16s, 1, floatTrunc, unchecked, 8u16s_C1R, ZELTEST_C1_VALUE, ZELTEST_DIV);
ZELTEST_ROW_MEMBER(Row8u16sC3, Zel8u, Zel16s, Zel16s, 3, floatTrunc, nonZero, 8u16s_C3R, ZELTEST_C3_VALUE, ZELTEST_DIV);
ZELTEST_ROW_MEMBER(RowLowC1, Zel16s, Zel16s, Zel16s, 1, low, nonZero, Low_16s_C1R, ZELTEST_C1_VALUE, ZELTEST_DIV);
ZELTEST_ROW_MEMBER(RowLowC3, Zel16s, Zel16s, Zel16s, 3, low, nonZero, Low_16s_C3R, ZELTEST_C3_VALUE, ZELTEST_DIV);

#define ZELTEST_COLUMN_MEMBER(Name, S_, D_, Tap_, channels_, arith_, rule_, suffix, divArg)                 \
  struct Name {                                                                                              \
    ZELTEST_MEMBER_TRAITS(S_, D_, Tap_, channels_, arith_, rule_, suffix)                                    \
    static ZelStatus call(const S** src, D* dst, int dstStep, ZeliSize roi, const Tap* kernel, int size,    \
                          int divisor, Zel8u* buffer) {                                                      \
      (void)divisor;                                                                                         \
      return zeliFilterColumnPipeline_##suffix(src, dst, dstStep, roi, kernel, size, divArg buffer);        \
    }                                                                                                        \
    static ZelStatus bufferSize(ZeliSize roi, int size, int* bytes) {                                        \
      return zeliFilterColumnPipelineGetBufferSize_##suffix(roi, size, bytes);                               \
    }                                                                                                        \
  }

ZELTEST_COLUMN_MEMBER(Col16sC1, Zel16s, Zel16s, Zel16s, 1, floatRound, nonZero, 16s_C1R, ZELTEST_DIV);
ZELTEST_COLUMN_MEMBER(Col16sC3, Zel16s, Zel16s, Zel16s, 3, floatRound, nonZero, 16s_C3R, ZELTEST_DIV);
ZELTEST_COLUMN_MEMBER(Col16s8sC1, Zel16s, Zel8s, Zel16s, 1, floatRound, nonZero, 16s8s_C1R, ZELTEST_DIV);
ZELTEST_COLUMN_MEMBER(Col16s8sC3, Zel16s, Zel8s, Zel16s, 3, floatRound, nonZero, 16s8s_C3R, ZELTEST_DIV);
ZELTEST_COLUMN_MEMBER(Col16s8uC1, Zel16s, Zel8u, Zel16s, 1, floatRound, nonZero, 16s8u_C1R, ZELTEST_DIV);
ZELTEST_COLUMN_MEMBER(Col16s8uC3, Zel16s, Zel8u, Zel16s, 3, floatRound, nonZero, 16s8u_C3R, ZELTEST_DIV);
ZELTEST_COLUMN_MEMBER(Col16uC1, Zel16u, Zel16u, Zel16s, 1, floatRound, nonZero, 16u_C1R, ZELTEST_DIV);
ZELTEST_COLUMN_MEMBER(Col16uC3, Zel16u, Zel16u, Zel16s, 3, floatRound, nonZero, 16u_C3R, ZELTEST_DIV);
ZELTEST_COLUMN_MEMBER(Col32fC1, Zel32f, Zel32f, Zel32f, 1, colFloat, none, 32f_C1R, ZELTEST_NODIV);
ZELTEST_COLUMN_MEMBER(Col32fC3, Zel32f, Zel32f, Zel32f, 3, colFloat, none, 32f_C3R, ZELTEST_NODIV);
ZELTEST_COLUMN_MEMBER(ColLowC1, Zel16s, Zel16s, Zel16s, 1, low, nonZero, Low_16s_C1R, ZELTEST_DIV);
ZELTEST_COLUMN_MEMBER(ColLowC3, Zel16s, Zel16s, Zel16s, 3, low, nonZero, Low_16s_C3R, ZELTEST_DIV);

#undef ZELTEST_ROW_MEMBER
#undef ZELTEST_COLUMN_MEMBER
#undef ZELTEST_MEMBER_TRAITS

// Random values that exercise a member's arithmetic: full-range pixels with
// small or large taps, so that sums both fit and saturate.
template <typename T, typename R>
T randomValue(R& rng, bool wide) {
  if constexpr (std::is_floating_point<T>::value) {
    return T(std::uniform_real_distribution<double>(wide ? -100.0 : -2.0, wide ? 100.0 : 2.0)(rng));
  } else {
    if (!wide) return T(std::uniform_int_distribution<int>(std::is_signed<T>::value ? -6 : 0, 12)(rng));
    return T(std::uniform_int_distribution<long long>(std::numeric_limits<T>::lowest(),
                                                      std::numeric_limits<T>::max())(rng));
  }
}

// Kernels of three kinds: small taps, full-range taps, and integer taps
// whose absolute sum sits on either side of the limits below which the
// library may form single-precision sums with exact integer arithmetic
// (sum|tap| x 255 < 2^15, 2^16 with taps >= 0, or 2^24 for 8-bit data,
// x 32768 < 2^24 for 16s).
enum class TapKind { small, wide, boundary };

template <typename Tap, typename R>
std::vector<Tap> randomKernel(R& rng, int size, TapKind kind) {
  std::vector<Tap> kernel(size);
  if constexpr (std::is_floating_point<Tap>::value) {
    for (Tap& t : kernel) t = Tap(std::uniform_real_distribution<double>(-2.0, 2.0)(rng));
  } else {
    static const int kLimits[] = {128, 129, 257, 258, 511, 512, 65792, 65793};
    int target = kLimits[rng() % 8];
    if (kind == TapKind::boundary && (target + size - 1) / size > 32767) target = 512;
    for (int k = 0; k < size; ++k) {
      int v = kind == TapKind::wide    ? std::uniform_int_distribution<int>(-32768, 32767)(rng)
              : kind == TapKind::small ? std::uniform_int_distribution<int>(-40, 40)(rng)
                                       : target / size + (k < target % size ? 1 : 0);
      if (kind == TapKind::boundary && rng() % 2) v = -v;
      kernel[k] = Tap(v);
    }
  }
  return kernel;
}

template <class M, typename R>
int randomDivisor(R& rng) {
  static const int kDivisors[] = {1, 1, 2, 3, 7, 16, 100, 333, 16384, 20000, -1, -2, -5, -300};
  int d = kDivisors[std::uniform_int_distribution<int>(0, 13)(rng)];
  if (M::rule == sepref::DivisorRule::positive && d < 0) d = -d;
  return d;
}

// A valid call with one change applied must give `want`; a refused call
// must leave the output as it was.
template <class Call, class Change>
void expectStatus(ZelStatus want, Change&& change, const char* what) {
  Call call;
  change(call);
  EXPECT_EQ(call.run(), want) << what;
  if (want != zelStatusOk) {
    EXPECT_TRUE(call.untouched()) << what;
  }
}

}  // namespace zeltest

#endif  // ZELCV_TESTS_SEPFILTER_MEMBERS_H
