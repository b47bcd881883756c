// Pyramid size arithmetic over a grid of sizes and rates, and the pyramid
// record: its chain of sizes and scales, its layout in one block, checks and
// allocation failure.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>

#include "support/fault_injection.h"
#include "zelcv.h"

namespace {

// The up range straight from its definition.
int64_t upMax(int64_t n, float rate) { return std::max<int64_t>(n + 1, int64_t(float(n) * rate)); }
int64_t upMin(int64_t n, float rate) {
  return n == 1 ? 1 : std::max<int64_t>(n + 1, int64_t(float(n - 1) * rate) + 1);
}

const float kRates[] = {1.0001f, 1.1f, 1.5f, 1.99999f, 2.0f, 2.5f, 3.0f, 7.3f, 10.0f};

TEST(PyramidSizes, DownSizeIsTheOneWhoseUpRangeHoldsTheSource) {
  for (float rate : kRates)
    for (int n = 1; n < 400; n += (n < 40 ? 1 : 7)) {
      ZeliSize d = {-1, -1};
      ASSERT_EQ(zeliGetPyramidDownROI({n, 401 - n}, &d, rate), zelStatusOk);
      SCOPED_TRACE(testing::Message() << n << " rate " << rate);
      EXPECT_GE(n, upMin(d.width, rate));
      EXPECT_LE(n, upMax(d.width, rate));
      EXPECT_GE(401 - n, upMin(d.height, rate));
      EXPECT_LE(401 - n, upMax(d.height, rate));
      ZeliSize lo, hi;
      ASSERT_EQ(zeliGetPyramidUpROI({n, 401 - n}, &lo, &hi, rate), zelStatusOk);
      EXPECT_EQ(lo.width, upMin(n, rate));
      EXPECT_EQ(hi.width, upMax(n, rate));
      EXPECT_EQ(lo.height, upMin(401 - n, rate));
      EXPECT_EQ(hi.height, upMax(401 - n, rate));
    }
  ZeliSize d;
  ASSERT_EQ(zeliGetPyramidDownROI({5, 4}, &d, 2.0f), zelStatusOk);
  EXPECT_EQ(d.width, 3);  // the up range of 2 is 3..4
  EXPECT_EQ(d.height, 2);
  ASSERT_EQ(zeliGetPyramidDownROI({INT32_MAX, 1}, &d, 1.5f), zelStatusOk);
  EXPECT_GE(int64_t(INT32_MAX), upMin(d.width, 1.5f));
  EXPECT_LE(int64_t(INT32_MAX), upMax(d.width, 1.5f));
}

TEST(PyramidSizes, Checks) {
  ZeliSize a = {7, 7}, b = {7, 7};
  EXPECT_EQ(zeliGetPyramidDownROI({0, 4}, nullptr, 0.0f), zelStatusNullPointer);
  EXPECT_EQ(zeliGetPyramidDownROI({0, 4}, &a, 0.0f), zelStatusBadSize);
  EXPECT_EQ(zeliGetPyramidDownROI({4, 4}, &a, 1.0f), zelStatusBadArgument);
  EXPECT_EQ(zeliGetPyramidDownROI({4, 4}, &a, 10.0001f), zelStatusBadArgument);
  EXPECT_EQ(zeliGetPyramidUpROI({4, 4}, &a, nullptr, 2.0f), zelStatusNullPointer);
  EXPECT_EQ(zeliGetPyramidUpROI({4, -4}, &a, &b, 2.0f), zelStatusBadSize);
  EXPECT_EQ(zeliGetPyramidUpROI({4, 4}, &a, &b, 1.0f), zelStatusBadArgument);
  EXPECT_EQ(zeliGetPyramidUpROI({INT32_MAX / 2, 4}, &a, &b, 3.0f), zelStatusBadSize);
  EXPECT_EQ(a.width, 7);
  EXPECT_EQ(b.height, 7);
}

bool aligned8(const void* p) { return reinterpret_cast<uintptr_t>(p) % 8 == 0; }

TEST(PyramidRecord, SizesScalesAndLayout) {
  for (float rate : {2.0f, 1.5f, 3.3f})
    for (ZeliSize base : {ZeliSize{640, 480}, ZeliSize{1, 7}, ZeliSize{33, 2}}) {
      SCOPED_TRACE(testing::Message() << base.width << "x" << base.height << " rate " << rate);
      zeltest::FaultInjection faults;
      ZeliPyramid* p = nullptr;
      ASSERT_EQ(zeliPyramidInitAlloc(&p, 1000, base, rate), zelStatusOk);
      EXPECT_EQ(faults.allocations(), 1);
      EXPECT_EQ(static_cast<void*>(p), faults.lastAllocation());
      // Every level's size follows from the one before; the top is 1 x 1.
      ZeliSize s = base;
      double scale = 1.0;
      for (int i = 0; i <= p->level; ++i) {
        EXPECT_EQ(p->roiSizes[i].width, s.width);
        EXPECT_EQ(p->roiSizes[i].height, s.height);
        EXPECT_EQ(p->scales[i], scale);
        EXPECT_EQ(p->images[i], nullptr);
        EXPECT_EQ(p->steps[i], 0);
        if (i < p->level) {
          EXPECT_TRUE(s.width >= 2 || s.height >= 2);
        }
        ASSERT_EQ(zeliGetPyramidDownROI(s, &s, rate), zelStatusOk);
        scale *= 1.0 / double(rate);
      }
      EXPECT_EQ(p->roiSizes[p->level].width, 1);
      EXPECT_EQ(p->roiSizes[p->level].height, 1);
      EXPECT_EQ(p->layerState, nullptr);
      // The arrays lie inside the one block, 8-byte aligned, apart.
      const char* start = reinterpret_cast<const char*>(p);
      const void* arrays[] = {p->images, p->roiSizes, p->scales, p->steps};
      for (const void* a : arrays) {
        EXPECT_TRUE(aligned8(a));
        EXPECT_GE(static_cast<const char*>(a), start + sizeof(ZeliPyramid));
      }
      const int n = p->level + 1;
      EXPECT_GE(reinterpret_cast<const char*>(p->roiSizes), reinterpret_cast<const char*>(p->images + n));
      EXPECT_GE(reinterpret_cast<const char*>(p->scales), reinterpret_cast<const char*>(p->roiSizes + n));
      EXPECT_GE(reinterpret_cast<const char*>(p->steps), reinterpret_cast<const char*>(p->scales + n));
      EXPECT_EQ(zeliPyramidFree(p), zelStatusOk);
      EXPECT_EQ(faults.liveBlocks(), 0);
    }
  // The requested level limits the top; rate 2 takes 640 x 480 to 1 x 1 in ten steps.
  ZeliPyramid* p = nullptr;
  ASSERT_EQ(zeliPyramidInitAlloc(&p, 3, {640, 480}, 2.0f), zelStatusOk);
  EXPECT_EQ(p->level, 3);
  EXPECT_EQ(p->roiSizes[3].width, 80);
  EXPECT_EQ(p->scales[3], 0.125);
  EXPECT_EQ(zeliPyramidFree(p), zelStatusOk);
  ASSERT_EQ(zeliPyramidInitAlloc(&p, 100, {640, 480}, 2.0f), zelStatusOk);
  EXPECT_EQ(p->level, 10);
  EXPECT_EQ(zeliPyramidFree(p), zelStatusOk);
}

TEST(PyramidRecord, ChecksAndAllocationFailure) {
  ZeliPyramid* p = reinterpret_cast<ZeliPyramid*>(&p);
  ZeliPyramid* const untouched = p;
  EXPECT_EQ(zeliPyramidInitAlloc(nullptr, 0, {0, 0}, 0.0f), zelStatusNullPointer);
  EXPECT_EQ(zeliPyramidInitAlloc(&p, 0, {4, 0}, 0.0f), zelStatusBadSize);
  EXPECT_EQ(zeliPyramidInitAlloc(&p, 1, {4, 4}, 1.0f), zelStatusBadArgument);
  EXPECT_EQ(zeliPyramidInitAlloc(&p, 0, {4, 4}, 2.0f), zelStatusBadArgument);
  zeltest::FaultInjection faults;
  faults.failAllocationsFrom(0);
  EXPECT_EQ(zeliPyramidInitAlloc(&p, 4, {64, 64}, 2.0f), zelStatusOutOfMemory);
  EXPECT_EQ(p, untouched);
  EXPECT_EQ(faults.liveBlocks(), 0);
  EXPECT_EQ(zeliPyramidFree(nullptr), zelStatusNullPointer);
}

}  // namespace
