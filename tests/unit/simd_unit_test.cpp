// The typed vector wrappers against scalar min/max on every lane, including
// the emulated ones (8s and 16u, 32s) where SSE2 lacks the instruction.
#include <gtest/gtest.h>

#include <algorithm>
#include <limits>
#include <random>

#include "kernels/simd.h"

namespace {

template <typename T>
void checkMinMax() {
  using V = zelcv::simd::Vec<T>;
  std::mt19937 rng(42);
  std::uniform_int_distribution<long long> value(std::numeric_limits<T>::min(), std::numeric_limits<T>::max());
  for (int round = 0; round < 200; ++round) {
    T a[V::kLanes], b[V::kLanes], lo[V::kLanes], hi[V::kLanes];
    for (int i = 0; i < V::kLanes; ++i) {
      a[i] = T(value(rng));
      b[i] = round % 3 == 0 ? a[i] : T(value(rng));
    }
    a[0] = std::numeric_limits<T>::min();
    b[1] = std::numeric_limits<T>::max();
    V::storeu(lo, V::min(V::loadu(a), V::loadu(b)));
    V::storeu(hi, V::max(V::loadu(a), V::loadu(b)));
    for (int i = 0; i < V::kLanes; ++i) {
      ASSERT_EQ(lo[i], std::min(a[i], b[i]));
      ASSERT_EQ(hi[i], std::max(a[i], b[i]));
    }
  }
}

TEST(Simd, MinMaxEveryElementType) {
  checkMinMax<uint8_t>();
  checkMinMax<int8_t>();
  checkMinMax<uint16_t>();
  checkMinMax<int16_t>();
  checkMinMax<int32_t>();
}

TEST(Simd, ElementsToAlignment) {
  alignas(16) float data[8];
  EXPECT_EQ(zelcv::simd::elementsToAlignment(data, 8), 0);
  EXPECT_EQ(zelcv::simd::elementsToAlignment(data + 1, 8), 3);
  EXPECT_EQ(zelcv::simd::elementsToAlignment(data + 3, 2), 1);
  alignas(16) uint8_t bytes[32];
  EXPECT_EQ(zelcv::simd::elementsToAlignment(bytes + 5, 100), 11);
  // A float row that starts off its element alignment never aligns.
  EXPECT_EQ(zelcv::simd::elementsToAlignment(reinterpret_cast<float*>(bytes + 2), 9), 9);
}

}  // namespace
