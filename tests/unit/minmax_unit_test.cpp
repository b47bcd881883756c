// The row kernels of the running max/min against a scalar window, on rows
// long enough for every vector path: each width kernel, the doubling kernel
// with and without a scratch row, and windows reaching past either end.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <vector>

#include "kernels/minmax.h"

namespace {

using zelcv::minmax::MaxOp;
using zelcv::minmax::MinOp;

template <typename T, typename Op>
void checkRows(std::mt19937& rng, int iterations) {
  for (int it = 0; it < iterations; ++it) {
    const int width = std::uniform_int_distribution<int>(1, 200)(rng);
    const int c = (it % 3 == 0) ? 1 : (it % 3 == 1 ? 3 : 4);
    int K = std::uniform_int_distribution<int>(1, it % 4 == 0 ? 2 * width - 1 : std::min(2 * width - 1, 20))(rng);
    int s = std::uniform_int_distribution<int>(-(width - 1), width - K)(rng);
    if (s + K - 1 < -(width - 1)) s = -(width - 1) - K + 1;
    std::vector<T> src(size_t(width) * c), out(size_t(width) * c + 1, T(77)), temp(size_t(width) * c);
    for (auto& v : src) v = T(std::uniform_int_distribution<int>(-100, 100)(rng));
    const bool withTemp = it % 2 == 0;
    zelcv::minmax::windowRow<T, Op>(src.data(), out.data(), width, c, s, K, withTemp ? temp.data() : nullptr);
    ASSERT_EQ(out.back(), T(77));
    for (int x = 0; x < width; ++x)
      for (int ch = 0; ch < c; ++ch) {
        T want = src[size_t(std::clamp(x + s, 0, width - 1)) * c + ch];
        for (int k = 1; k < K; ++k) want = Op::s(want, src[size_t(std::clamp(x + s + k, 0, width - 1)) * c + ch]);
        ASSERT_EQ(out[size_t(x) * c + ch], want) << "width " << width << " K " << K << " s " << s << " c " << c
                                                  << " x " << x << " temp " << withTemp;
      }
  }
}

TEST(MinMaxKernels, WindowRowMatchesScalarWindows) {
  std::mt19937 rng(21);
  checkRows<uint8_t, MaxOp<uint8_t>>(rng, 600);
  checkRows<uint8_t, MinOp<uint8_t>>(rng, 300);
  checkRows<int16_t, MaxOp<int16_t>>(rng, 300);
  checkRows<uint16_t, MinOp<uint16_t>>(rng, 300);
  checkRows<float, MaxOp<float>>(rng, 300);
}

}  // namespace
