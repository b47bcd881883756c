// The tracking state: its InitAlloc for each element type and the one
// release routine the three Free names share.
#include <limits.h>

#include "core/alloc.h"
#include "core/sizes.h"
#include "core/status.h"
#include "motion/optflow_state.h"

namespace zelcv {
namespace optflow {

SizeCalc workBlockBytes(ZeliSize roi, int winSize) {
  const SizeCalc ws = SizeCalc(winSize) + 3;
  const SizeCalc plane = (SizeCalc(roi.width) + 5) * (SizeCalc(roi.height) + 5);
  const SizeCalc window = (SizeCalc(winSize) * 12 + 36) * ws;
  return (window + scharrFloats(roi.width) + plane * 3) * 4 + 36;
}

WorkLayout::WorkLayout(void* block, ZeliSize roi, int winSize) {
  const size_t ws = size_t(winSize) + 3;
  const size_t area = ws * ws;
  // Each window array starts 16-byte aligned; the twelve areas the formula
  // gives leave room for the rounding of nine.
  uint8_t* p = alignUp(block, 32);
  auto take = [&p](size_t bytes) {
    uint8_t* at = p;
    p = alignUp(p + bytes, 16);
    return at;
  };
  stride = int(ws);
  i = reinterpret_cast<float*>(take(area * 4));
  j = reinterpret_cast<float*>(take(area * 4));
  ix = reinterpret_cast<float*>(take(area * 4));
  iy = reinterpret_cast<float*>(take(area * 4));
  margin = reinterpret_cast<float*>(take(area * 4));
  ixd = reinterpret_cast<double*>(take(area * 8));
  iyd = reinterpret_cast<double*>(take(area * 8));
  windowBytes = size_t(p - static_cast<uint8_t*>(alignUp(block, 32)));
  p = alignUp(static_cast<uint8_t*>(alignUp(block, 32)) + 12 * area * 4, 16);
  scratch = p;
  p = alignUp(p + size_t(scharrFloats(roi.width).value()) * 4, 16);
  const size_t plane = (size_t(roi.width) + 5) * (size_t(roi.height) + 5);
  level = reinterpret_cast<float*>(p);
  gx = level + plane;
  gy = gx + plane;
}

}  // namespace optflow
}  // namespace zelcv

using zelcv::SizeCalc;

namespace {

ZelStatus initAlloc(ZeliOptFlowPyrLKState** state, ZeliSize roiSize, int winSize, int hint) {
  if (!state) return zelStatusNullPointer;
  if (zelcv::checkSize(roiSize) || winSize < 1) return zelStatusBadSize;
  const SizeCalc bytes = zelcv::optflow::workBlockBytes(roiSize, winSize);
  auto* s = static_cast<ZeliOptFlowPyrLKState*>(zelcv::allocBytes(int(sizeof(ZeliOptFlowPyrLKState))));
  if (!s) return zelStatusOutOfMemory;
  void* work = bytes > SizeCalc(INT_MAX) ? nullptr : zelcv::allocBytes(int(bytes.value()));
  if (!work) {
    zelcv::release(s);
    return zelStatusOutOfMemory;
  }
  s->roiSize = roiSize;
  s->winSize = winSize;
  s->hint = hint;
  s->work = work;
  *state = s;
  return zelStatusOk;
}

}  // namespace

ZELCV_ENTRY(zeliOpticalFlowPyrLKInitAlloc_8u_C1R)(ZeliOptFlowPyrLKState** state, ZeliSize roiSize, int winSize,
                                                  int hint) {
  return initAlloc(state, roiSize, winSize, hint);
}
ZELCV_ENTRY(zeliOpticalFlowPyrLKInitAlloc_16u_C1R)(ZeliOptFlowPyrLKState** state, ZeliSize roiSize, int winSize,
                                                   int hint) {
  return initAlloc(state, roiSize, winSize, hint);
}
ZELCV_ENTRY(zeliOpticalFlowPyrLKInitAlloc_32f_C1R)(ZeliOptFlowPyrLKState** state, ZeliSize roiSize, int winSize,
                                                   int hint) {
  return initAlloc(state, roiSize, winSize, hint);
}

// The work block first, then the head record.
ZELCV_SHARED_ENTRY(releaseOpticalFlowPyrLK)(ZeliOptFlowPyrLKState* state) {
  if (!state) return zelStatusNullPointer;
  if (state->work) zelcv::release(state->work);
  zelcv::release(state);
  return zelStatusOk;
}
