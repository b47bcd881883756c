// The difference kernel of compound morphology against plain arithmetic, on
// every length up to a few vectors (vector body and scalar tail), extreme
// values included, with the output aliasing either operand.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <cstdint>
#include <limits>
#include <random>
#include <vector>

#include "kernels/morphadv.h"

namespace {

template <typename T>
T draw(std::mt19937& rng) {
  if constexpr (std::is_floating_point<T>::value) {
    const int pick = std::uniform_int_distribution<int>(0, 9)(rng);
    if (pick == 0) return std::numeric_limits<T>::quiet_NaN();
    if (pick == 1) return std::numeric_limits<T>::infinity();
    if (pick == 2) return -0.0f;
    return std::uniform_real_distribution<T>(-1e3f, 1e3f)(rng);
  } else {
    return T(std::uniform_int_distribution<long long>(std::numeric_limits<T>::min(),
                                                      std::numeric_limits<T>::max())(rng));
  }
}

template <typename T>
T expected(T a, T b) {
  if constexpr (std::is_floating_point<T>::value) {
    const T d = a - b;
    return d > 0 ? d : T(0);  // NaN gives 0
  } else {
    const long long d = (long long)a - (long long)b;
    const long long lo = std::is_signed<T>::value ? std::numeric_limits<T>::min() : 0;
    return T(std::max(lo, std::min<long long>(std::numeric_limits<T>::max(), d)));
  }
}

template <typename T>
bool same(T x, T y) {
  return std::memcmp(&x, &y, sizeof x) == 0;
}

template <typename T>
void check(int seed) {
  std::mt19937 rng(seed);
  for (int n = 0; n < 70; ++n)
    for (int alias = 0; alias < 3; ++alias) {
      std::vector<T> a(size_t(n) + 1), b(size_t(n) + 1), out(size_t(n) + 1, T(7));
      for (int i = 0; i < n; ++i) a[i] = draw<T>(rng), b[i] = draw<T>(rng);
      const std::vector<T> a0 = a, b0 = b;
      T* target = alias == 0 ? out.data() : alias == 1 ? a.data() : b.data();
      zelcv::morphadv::difference<T>(a.data() , b.data(), target, n);
      for (int i = 0; i < n; ++i) ASSERT_TRUE(same(target[i], expected(a0[i], b0[i]))) << n << " " << i;
      ASSERT_TRUE(same(target[n], alias == 0 ? T(7) : alias == 1 ? a0[n] : b0[n]));  // nothing past n
    }
}

TEST(MorphAdvKernels, DifferenceMatchesScalarArithmetic) {
  check<uint8_t>(1);
  check<uint16_t>(2);
  check<int16_t>(3);
  check<float>(4);
}

}  // namespace
