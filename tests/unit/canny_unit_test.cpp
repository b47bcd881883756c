// Canny internals that the exports only show indirectly: the tangent
// constants' bit patterns and the squared low limit that lets the L2 path
// skip its roots.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>

#include "features/canny_kernels.h"

namespace {

using namespace zelcv::canny;

uint32_t bitsOf(float f) {
  uint32_t b;
  std::memcpy(&b, &f, sizeof b);
  return b;
}

TEST(CannyKernels, TangentConstantsHaveTheirBitPatterns) {
  EXPECT_EQ(bitsOf(kTan22), 0x3ED413CDu);
  EXPECT_EQ(bitsOf(kTan67), 0x401A827Au);
  volatile float two = 2.0f;
  EXPECT_EQ(bitsOf(two + kTan22), 0x401A827Au);
}

template <LowRule R>
void checkLimit(float low) {
  auto passes = [&](int64_t s) { return passesLow<R>(float(std::sqrt(double(s))), low); };
  const int32_t limit = squaredLowLimit<R>(low);
  SCOPED_TRACE(testing::Message() << "low " << low << " limit " << limit);
  if (limit >= 0) {
    EXPECT_FALSE(passes(limit));
  }
  if (limit < INT32_MAX) {
    EXPECT_TRUE(passes(int64_t(limit) + 1));
  }
}

TEST(CannyKernels, SquaredLowLimitSplitsPassingSums) {
  for (float low : {0.0f, 1e-9f, 0.5f, 1.0f, 40.0f, 40.5f, 99.99f, 1000.25f, 24480.0f, 46340.95f, 46341.0f, 1e9f}) {
    checkLimit<LowRule::kStrict>(low);
    checkLimit<LowRule::kKeepEqual>(low);
  }
  EXPECT_EQ(squaredLowLimit<LowRule::kStrict>(40.0f), 1600);  // 40 itself fails "> 40"
  EXPECT_EQ(squaredLowLimit<LowRule::kKeepEqual>(40.0f), 1599);
  EXPECT_EQ(squaredLowLimit<LowRule::kKeepEqual>(0.0f), -1);
}

}  // namespace
