// The vector paths of the integral and rectangle-deviation kernels against
// their scalar references, bit for bit, on general values (large, fractional,
// negative) where the order of floating operations would show.
#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <vector>

#include "detect/rect_stddev.h"
#include "kernels/integral.h"

namespace {

using namespace zelcv;

template <typename T>
T randomValue(std::mt19937& rng) {
  if constexpr (std::is_floating_point<T>::value) {
    std::uniform_real_distribution<double> mantissa(-1.0, 1.0);
    return T(std::ldexp(mantissa(rng), std::uniform_int_distribution<int>(-4, 40)(rng)));
  } else {
    return T(rng());
  }
}

template <typename T>
std::vector<T> randomRow(std::mt19937& rng, int n) {
  std::vector<T> v(n);
  for (T& e : v) e = randomValue<T>(rng);
  return v;
}

std::vector<uint8_t> randomBytes(std::mt19937& rng, int n) {
  std::vector<uint8_t> v(n);
  for (uint8_t& e : v) e = uint8_t(rng());
  return v;
}

template <typename T>
bool sameBits(const std::vector<T>& a, const std::vector<T>& b) {
  return a.size() == b.size() && std::memcmp(a.data(), b.data(), a.size() * sizeof(T)) == 0;
}

template <class Sum, class Sq>
void checkIntegralRow(std::mt19937& rng) {
  using S = typename Sum::T;
  using Q = typename Sq::T;
  for (int round = 0; round < 200; ++round) {
    int w = std::uniform_int_distribution<int>(1, 90)(rng);
    auto src = randomBytes(rng, w);
    auto above = randomRow<S>(rng, w);
    auto aboveSq = randomRow<Q>(rng, w);
    std::vector<S> a(w), b(w);
    std::vector<Q> qa(w), qb(w);
    integral::integralRow<Sum, Sq>(src.data(), above.data(), a.data(), aboveSq.data(), qa.data(), w, false);
    integral::integralRow<Sum, Sq>(src.data(), above.data(), b.data(), aboveSq.data(), qb.data(), w, true);
    ASSERT_TRUE(sameBits(a, b)) << "width " << w;
    ASSERT_TRUE(sameBits(qa, qb)) << "width " << w;
  }
}

TEST(IntegralKernels, PlainRowsSimdMatchesScalar) {
  std::mt19937 rng(601);
  checkIntegralRow<integral::Plane32s, integral::NoPlane>(rng);
  checkIntegralRow<integral::Plane32f, integral::NoPlane>(rng);
  checkIntegralRow<integral::Plane32s, integral::Plane32s>(rng);
  checkIntegralRow<integral::Plane32s, integral::Plane64f>(rng);
  checkIntegralRow<integral::Plane32f, integral::Plane64f>(rng);
  for (int round = 0; round < 200; ++round) {
    int w = std::uniform_int_distribution<int>(1, 90)(rng);
    auto src = randomRow<float>(rng, w), above = randomRow<float>(rng, w);
    std::vector<float> a(w), b(w);
    integral::integralRow32f(src.data(), above.data(), a.data(), w, false);
    integral::integralRow32f(src.data(), above.data(), b.data(), w, true);
    ASSERT_TRUE(sameBits(a, b)) << "width " << w;
  }
}

// The sums-only rows of each instruction set against the scalar reference,
// over widths well past the wide kernel's staging distance, on bright and
// random pixels.
template <class Sum, class Isa>
void checkSumRow(std::mt19937& rng) {
  using S = typename Sum::T;
  for (int round = 0; round < 120; ++round) {
    int w = round < 40 ? round + 1 : std::uniform_int_distribution<int>(1, 1500)(rng);
    auto src = randomBytes(rng, w);
    if (round % 4 == 0)
      for (uint8_t& p : src) p = uint8_t(255 - p % 8);
    auto above = randomRow<S>(rng, w);
    std::vector<S> a(w), b(w);
    integral::integralRow<Sum, integral::NoPlane>(src.data(), above.data(), a.data(), nullptr, nullptr, w,
                                                  false);
    integral::sumRow<Sum, Isa>(src.data(), above.data(), b.data(), w);
    ASSERT_TRUE(sameBits(a, b)) << "width " << w;
  }
}

TEST(IntegralKernels, SumRowsOfEveryInstructionSetMatchScalar) {
  std::mt19937 rng(604);
  checkSumRow<integral::Plane32s, simd::Sse2>(rng);
  checkSumRow<integral::Plane32f, simd::Sse2>(rng);
  if (!__builtin_cpu_supports("avx2")) GTEST_SKIP() << "no AVX2 on this processor";
  checkSumRow<integral::Plane32s, avx2::Isa>(rng);
  checkSumRow<integral::Plane32f, avx2::Isa>(rng);
}

template <class Plane, bool Square>
void checkTiltedRow(std::mt19937& rng, integral::TiltEdge edge) {
  using T = typename Plane::T;
  for (int round = 0; round < 150; ++round) {
    int w = std::uniform_int_distribution<int>(1, 60)(rng);
    auto src = randomBytes(rng, w + 1);
    auto p = randomRow<T>(rng, w + 2), pp = randomRow<T>(rng, w + 2);
    std::vector<T> a = randomRow<T>(rng, w + 2), b = a;
    integral::tiltedRow<Plane, Square>(src.data(), p.data(), pp.data(), a.data(), w, edge, false);
    integral::tiltedRow<Plane, Square>(src.data(), p.data(), pp.data(), b.data(), w, edge, true);
    ASSERT_TRUE(sameBits(a, b)) << "width " << w;
  }
}

TEST(IntegralKernels, TiltedRowsSimdMatchesScalar) {
  std::mt19937 rng(602);
  using integral::TiltEdge;
  for (TiltEdge edge : {TiltEdge::ReadRight, TiltEdge::Clear, TiltEdge::AddPrevious}) {
    checkTiltedRow<integral::Tilt32s, false>(rng, edge);
    checkTiltedRow<integral::Tilt32s, true>(rng, edge);
    checkTiltedRow<integral::Tilt32f, false>(rng, edge);
    checkTiltedRow<integral::Tilt64f, true>(rng, edge);
  }
}

template <class Sum, class Sq, class Out, rectstd::Moments M>
void checkStdDevRow(std::mt19937& rng) {
  using S = typename Sum::T;
  using Q = typename Sq::T;
  for (int round = 0; round < 150; ++round) {
    int w = std::uniform_int_distribution<int>(1, 40)(rng);
    std::vector<S> s[4];
    std::vector<Q> q[4];
    for (int k = 0; k < 4; ++k) {
      s[k] = randomRow<S>(rng, w);
      q[k] = randomRow<Q>(rng, w);
    }
    // Some rectangles with a zero or negative variance.
    for (int x = 0; x < w; x += 3) {
      s[1][x] = s[0][x];
      s[3][x] = s[2][x];
      q[1][x] = q[0][x];
      q[3][x] = q[2][x];
    }
    rectstd::Corners<S> cs = {s[0].data(), s[1].data(), s[2].data(), s[3].data()};
    rectstd::Corners<Q> cq = {q[0].data(), q[1].data(), q[2].data(), q[3].data()};
    double n = double(std::uniform_int_distribution<int>(1, 5000)(rng));
    double scale = std::ldexp(1.0, std::uniform_int_distribution<int>(-8, 8)(rng));
    std::vector<typename Out::T> a(w), b(w);
    rectstd::stdDevRow<Sum, Sq, Out, M>(cs, cq, a.data(), w, 1.0 / n, n, scale, false);
    rectstd::stdDevRow<Sum, Sq, Out, M>(cs, cq, b.data(), w, 1.0 / n, n, scale, true);
    ASSERT_TRUE(sameBits(a, b)) << "width " << w;
  }
}

TEST(IntegralKernels, StdDevRowsSimdMatchesScalar) {
  std::mt19937 rng(603);
  using namespace rectstd;
  checkStdDevRow<Sum32f, SumSq64f, Out32f, Moments::MeanSquare>(rng);
  checkStdDevRow<Sum32s, SumSq64f, Out32f, Moments::MeanSquare>(rng);
  checkStdDevRow<Sum32s, SumSq32u, Out32sScaled, Moments::Numerator>(rng);
  checkStdDevRow<Sum32s, SumSq32u, Out32sScaled, Moments::MeanSquare>(rng);
}

}  // namespace
