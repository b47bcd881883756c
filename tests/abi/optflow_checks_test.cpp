// The tracking state's construction and release, the tracking call's checks
// in their order (nothing written on failure), and the statuses and errors of
// points that are lost: flat windows, windows outside both images, maxLev 0.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <vector>

#include "support/fault_injection.h"
#include "zelcv.h"

namespace {

TEST(OpticalFlowState, InitAllocChecksAndReleasesAPartlyBuiltState) {
  ZeliOptFlowPyrLKState* s = reinterpret_cast<ZeliOptFlowPyrLKState*>(uintptr_t(0x10));
  EXPECT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(nullptr, {0, 0}, 0, 0), zelStatusNullPointer);
  EXPECT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&s, {0, 5}, 5, 0), zelStatusBadSize);
  EXPECT_EQ(zeliOpticalFlowPyrLKInitAlloc_16u_C1R(&s, {5, -1}, 5, 0), zelStatusBadSize);
  EXPECT_EQ(zeliOpticalFlowPyrLKInitAlloc_32f_C1R(&s, {5, 5}, 0, 0), zelStatusBadSize);
  // A work block beyond INT_MAX bytes cannot be had.
  EXPECT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&s, {20000, 20000}, 5, 0), zelStatusOutOfMemory);
  EXPECT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&s, {5, 5}, 1 << 20, 0), zelStatusOutOfMemory);
  EXPECT_EQ(s, reinterpret_cast<ZeliOptFlowPyrLKState*>(uintptr_t(0x10)));
  for (int fail = 0; fail < 2; ++fail) {
    zeltest::FaultInjection faults;
    faults.failAllocationsFrom(fail);
    EXPECT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&s, {64, 48}, 9, 3), zelStatusOutOfMemory);
    EXPECT_EQ(faults.liveBlocks(), 0);
    EXPECT_EQ(s, reinterpret_cast<ZeliOptFlowPyrLKState*>(uintptr_t(0x10)));
  }
  zeltest::FaultInjection faults;
  ASSERT_EQ(zeliOpticalFlowPyrLKInitAlloc_32f_C1R(&s, {64, 48}, 9, 3), zelStatusOk);
  EXPECT_EQ(faults.allocations(), 2);
  EXPECT_EQ(zeliOpticalFlowPyrLKFree_16u_C1R(s), zelStatusOk);
  EXPECT_EQ(faults.liveBlocks(), 0);
  EXPECT_EQ(zeliOpticalFlowPyrLKFree_8u_C1R(nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliOpticalFlowPyrLKFree_32f_C1R(nullptr), zelStatusNullPointer);
}

TEST(OpticalFlowState, WorkBlockHasTheDocumentedSize) {
  for (int win : {1, 5, 21}) {
    for (ZeliSize roi : {ZeliSize{1, 1}, ZeliSize{64, 48}, ZeliSize{640, 480}}) {
      zeltest::FaultInjection faults;
      ZeliOptFlowPyrLKState* s = nullptr;
      ASSERT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&s, roi, win, 0), zelStatusOk);
      ASSERT_NE(faults.lastAllocation(), nullptr);
      // The second allocation is the work block.
      const int64_t f = 32 * (int64_t(roi.width) + 5) + 288;
      const int64_t want = ((int64_t(win) * 12 + 36) * (win + 3) + f +
                            3 * (int64_t(roi.width) + 5) * (roi.height + 5)) * 4 + 36;
      EXPECT_EQ(faults.allocations(), 2);
      // Fill the whole block: the sanitizer build sees any shortfall.
      std::memset(faults.lastAllocation(), 0x3C, size_t(want));
      EXPECT_EQ(zeliOpticalFlowPyrLKFree_8u_C1R(s), zelStatusOk);
    }
  }
}

// A 2-level pyramid over caller images.
struct SmallPyr {
  ZeliPyramid rec{};
  Zel8u* images[2];
  ZeliSize sizes[2];
  Zel64f scales[2] = {1.0, 0.5};
  int steps[2];
  std::vector<Zel8u> l0, l1;
  SmallPyr(int w, int h, bool flat) : l0(size_t(w) * h), l1(size_t((w + 1) / 2) * ((h + 1) / 2)) {
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x)
        l0[size_t(y) * w + x] = flat ? 100 : Zel8u(128 + 60 * std::sin(x * 0.5) * std::cos(y * 0.4));
    const int w1 = (w + 1) / 2, h1 = (h + 1) / 2;
    for (int y = 0; y < h1; ++y)
      for (int x = 0; x < w1; ++x) l1[size_t(y) * w1 + x] = l0[size_t(2 * y) * w + 2 * x];
    images[0] = l0.data();
    images[1] = l1.data();
    sizes[0] = {w, h};
    sizes[1] = {w1, h1};
    steps[0] = w;
    steps[1] = w1;
    rec = {images, sizes, scales, steps, nullptr, 1};
  }
};

struct Call {
  std::vector<ZeliPoint_32f> prev, next;
  std::vector<Zel8s> status;
  std::vector<Zel32f> error;
  explicit Call(std::vector<ZeliPoint_32f> points)
      : prev(points), next(points), status(points.size(), Zel8s(-7)), error(points.size(), -3.0f) {}
  ZelStatus run(const ZeliPyramid* a, const ZeliPyramid* b, int win, int maxLev, int maxIter, float threshold,
                ZeliOptFlowPyrLKState* state) {
    return zeliOpticalFlowPyrLK_8u_C1R(a, b, prev.data(), next.data(), status.data(), error.data(), int(prev.size()),
                                       win, maxLev, maxIter, threshold, state);
  }
  bool untouched() const {
    for (size_t i = 0; i < prev.size(); ++i)
      if (status[i] != -7 || error[i] != -3.0f || next[i].x != prev[i].x || next[i].y != prev[i].y) return false;
    return true;
  }
};

TEST(OpticalFlowChecks, TheFirstFailingCheckDecidesAndNothingIsWritten) {
  SmallPyr a(40, 30, false), b(40, 30, false);
  ZeliOptFlowPyrLKState* state = nullptr;
  ASSERT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&state, {40, 30}, 7, 0), zelStatusOk);
  const std::vector<ZeliPoint_32f> pts = {{20, 15}, {10, 10}};
  struct Case {
    const char* what;
    ZelStatus want;
    int win, maxLev, maxIter;
    float threshold;
    bool nullState;
  };
  const Case cases[] = {
      {"null state beats a bad window", zelStatusNullPointer, 0, -1, 0, -1.0f, true},
      {"window 0 beats maxLev -1", zelStatusBadSize, 0, -1, 0, -1.0f, false},
      {"window not the state's", zelStatusBadSize, 9, 0, 5, 0.1f, false},
      {"maxLev -1", zelStatusBadArgument, 7, -1, 5, 0.1f, false},
      {"maxIter 0", zelStatusBadArgument, 7, 0, 0, 0.1f, false},
      {"negative threshold", zelStatusBadArgument, 7, 0, 5, -0.5f, false},
      {"NaN threshold", zelStatusBadArgument, 7, 0, 5, NAN, false},
      {"maxLev above the pyramids", zelStatusBadArgument, 7, 2, 5, 0.1f, false},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    Call call(pts);
    EXPECT_EQ(call.run(&a.rec, &b.rec, c.win, c.maxLev, c.maxIter, c.threshold, c.nullState ? nullptr : state),
              c.want);
    EXPECT_TRUE(call.untouched());
  }
  {
    Call call(pts);
    EXPECT_EQ(zeliOpticalFlowPyrLK_8u_C1R(&a.rec, &b.rec, call.prev.data(), call.next.data(), call.status.data(),
                                          call.error.data(), 0, 7, 1, 5, 0.1f, state),
              zelStatusBadSize);
    EXPECT_TRUE(call.untouched());
    EXPECT_EQ(zeliOpticalFlowPyrLK_8u_C1R(&a.rec, nullptr, call.prev.data(), call.next.data(), call.status.data(),
                                          call.error.data(), 0, 0, -1, 0, 0.1f, state),
              zelStatusNullPointer);
    EXPECT_EQ(zeliOpticalFlowPyrLK_8u_C1R(&a.rec, &b.rec, call.prev.data(), call.next.data(), nullptr,
                                          call.error.data(), 2, 7, 1, 5, 0.1f, state),
              zelStatusNullPointer);
    EXPECT_TRUE(call.untouched());
  }
  // The levels of the pyramids: a missing image, a bad size, a short step.
  {
    SmallPyr c(40, 30, false);
    c.images[1] = nullptr;
    Call call(pts);
    EXPECT_EQ(call.run(&a.rec, &c.rec, 7, 1, 5, 0.1f, state), zelStatusNullPointer);
    EXPECT_EQ(call.run(&a.rec, &c.rec, 7, 0, 5, 0.1f, state), zelStatusOk);  // level 1 not used
  }
  {
    SmallPyr c(40, 30, false);
    c.sizes[1].height = 0;
    c.steps[0] = 39;
    Call call(pts);
    EXPECT_EQ(call.run(&c.rec, &b.rec, 7, 1, 5, 0.1f, state), zelStatusBadSize);
    EXPECT_TRUE(call.untouched());
    c.sizes[1].height = 15;
    EXPECT_EQ(call.run(&c.rec, &b.rec, 7, 1, 5, 0.1f, state), zelStatusBadStep);
    EXPECT_TRUE(call.untouched());
  }
  zeliOpticalFlowPyrLKFree_8u_C1R(state);
}

TEST(OpticalFlowChecks, MisalignedLevelStepsOfWideTypes) {
  std::vector<Zel32f> level(64 * 20, 1.0f);
  Zel8u* images[1] = {reinterpret_cast<Zel8u*>(level.data())};
  ZeliSize sizes[1] = {{30, 20}};
  Zel64f scales[1] = {1.0};
  int steps[1] = {30 * 4 + 2};
  ZeliPyramid p = {images, sizes, scales, steps, nullptr, 0};
  ZeliOptFlowPyrLKState* state = nullptr;
  ASSERT_EQ(zeliOpticalFlowPyrLKInitAlloc_32f_C1R(&state, {30, 20}, 5, 0), zelStatusOk);
  ZeliPoint_32f prev = {10, 10}, next = prev;
  Zel8s status = 9;
  Zel32f error = 9;
  EXPECT_EQ(zeliOpticalFlowPyrLK_32f_C1R(&p, &p, &prev, &next, &status, &error, 1, 5, 0, 5, 0.1f, state),
            zelStatusMisalignedStep);
  EXPECT_EQ(status, 9);
  steps[0] = 30 * 4 + 4;
  EXPECT_EQ(zeliOpticalFlowPyrLK_32f_C1R(&p, &p, &prev, &next, &status, &error, 1, 5, 0, 5, 0.1f, state),
            zelStatusOk);
  EXPECT_EQ(status, 1);  // a flat window: lost at level 0
  EXPECT_EQ(error, 0.0f);
  zeliOpticalFlowPyrLKFree_32f_C1R(state);
}

TEST(OpticalFlowLostPoints, FlatWindowsOutsideWindowsAndLevelZeroOnly) {
  SmallPyr textured(60, 40, false), flat(60, 40, true);
  ZeliOptFlowPyrLKState* state = nullptr;
  ASSERT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&state, {60, 40}, 9, 0), zelStatusOk);
  {
    // A flat first image: det 0 at the top level for every point.
    Call call({{30, 20}, {12, 9}});
    ASSERT_EQ(call.run(&flat.rec, &textured.rec, 9, 1, 10, 0.01f, state), zelStatusOk);
    for (size_t i = 0; i < 2; ++i) {
      EXPECT_EQ(call.status[i], 2);
      EXPECT_EQ(call.error[i], 0.0f);
      EXPECT_EQ(call.next[i].x, call.prev[i].x);
    }
  }
  {
    // Windows that leave both images entirely: lost at the top level.
    Call call({{-40, 20}, {30, 95}, {30, 20}});
    ASSERT_EQ(call.run(&textured.rec, &textured.rec, 9, 1, 10, 0.01f, state), zelStatusOk);
    EXPECT_EQ(call.status[0], 2);
    EXPECT_EQ(call.status[1], 2);
    EXPECT_EQ(call.error[0], 0.0f);
    EXPECT_EQ(call.error[1], 0.0f);
    // Identical images: the point stays where it is with no error.
    EXPECT_EQ(call.status[2], 0);
    EXPECT_EQ(call.next[2].x, 30.0f);
    EXPECT_EQ(call.next[2].y, 20.0f);
    EXPECT_EQ(call.error[2], 0.0f);
  }
  {
    // maxLev 0: only level 0, tracked points get status 0; threshold 0 runs
    // until the oscillation test or maxIter.
    Call call({{30, 20}, {20, 15}});
    call.next[0] = {30.7f, 19.6f};
    ASSERT_EQ(call.run(&textured.rec, &textured.rec, 9, 0, 40, 0.0f, state), zelStatusOk);
    EXPECT_EQ(call.status[0], 0);
    EXPECT_EQ(call.status[1], 0);
    EXPECT_NEAR(call.next[0].x, 30.0f, 0.02f);
    EXPECT_NEAR(call.next[0].y, 20.0f, 0.02f);
  }
  zeliOpticalFlowPyrLKFree_8u_C1R(state);
}

}  // namespace
