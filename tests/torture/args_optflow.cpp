// Torture table: pyramidal optical flow. The tracking call takes no image
// arguments of its own: its pyramids are records built in the arena with
// textured levels for the ROI the test makes, the points and outputs are
// blocks, and the state comes from the family's InitAlloc.
#include <cstdint>
#include <cstring>

#include "torture/torture.h"

namespace {

// A two-level pyramid record of T images (w x h, then half of it).
template <typename T>
void* makePyramid(zeltorture::Arena& arena, ZeliSize roi) {
  auto* rec = static_cast<ZeliPyramid*>(arena.block(sizeof(ZeliPyramid)));
  auto* images = static_cast<Zel8u**>(arena.block(2 * sizeof(Zel8u*)));
  auto* sizes = static_cast<ZeliSize*>(arena.block(2 * sizeof(ZeliSize)));
  auto* scales = static_cast<Zel64f*>(arena.block(2 * sizeof(Zel64f)));
  auto* steps = static_cast<int*>(arena.block(2 * sizeof(int)));
  if (!rec || !images || !sizes || !scales || !steps) return nullptr;
  for (int l = 0; l < 2; ++l) {
    const ZeliSize s = l == 0 ? roi : ZeliSize{(roi.width + 1) / 2, (roi.height + 1) / 2};
    const size_t step = size_t(s.width) * sizeof(T);
    auto* data = static_cast<Zel8u*>(arena.block(step * size_t(s.height)));
    if (!data) return nullptr;
    for (int y = 0; y < s.height; ++y) {
      T* row = reinterpret_cast<T*>(data + step * size_t(y));
      for (int x = 0; x < s.width; ++x) row[x] = T((x * 37 + y * 11 + x * y * 5) % 200);
    }
    images[l] = data;
    sizes[l] = s;
    scales[l] = l == 0 ? 1.0 : 0.5;
    steps[l] = int(step);
  }
  ZeliPyramid p = {images, sizes, scales, steps, nullptr, 1};
  std::memcpy(rec, &p, sizeof p);
  return rec;
}

template <typename Init, typename Release>
zeltorture::Maker stateMaker(Init init, Release release) {
  return zeltorture::Maker{[=](zeltorture::Arena&, ZeliSize roi) -> void* {
                             ZeliOptFlowPyrLKState* s = nullptr;
                             return init(&s, roi, 5, 0) == zelStatusOk ? s : nullptr;
                           },
                           [=](void* p) { release(static_cast<ZeliOptFlowPyrLKState*>(p)); }};
}

}  // namespace

TORTURE_MAKER(optflow_pyr_8u, makePyramid<Zel8u>, nullptr);
TORTURE_MAKER(optflow_pyr_16u, makePyramid<Zel16u>, nullptr);
TORTURE_MAKER(optflow_pyr_32f, makePyramid<Zel32f>, nullptr);
static const zeltorture::Registrar tortureMaker_optflow_8u(
    "optflow_8u", stateMaker(zeliOpticalFlowPyrLKInitAlloc_8u_C1R, zeliOpticalFlowPyrLKFree_8u_C1R));
static const zeltorture::Registrar tortureMaker_optflow_16u(
    "optflow_16u", stateMaker(zeliOpticalFlowPyrLKInitAlloc_16u_C1R, zeliOpticalFlowPyrLKFree_16u_C1R));
static const zeltorture::Registrar tortureMaker_optflow_32f(
    "optflow_32f", stateMaker(zeliOpticalFlowPyrLKInitAlloc_32f_C1R, zeliOpticalFlowPyrLKFree_32f_C1R));

#define OPTFLOW_LINES(t)                                                                                      \
  TORTURE(zeliOpticalFlowPyrLKInitAlloc_##t##_C1R, "new=optflow_" #t " roi =5 =0"),                         \
      TORTURE(zeliOpticalFlowPyrLKFree_##t##_C1R, "obj=optflow_" #t),                                        \
      TORTURE(zeliOpticalFlowPyrLK_##t##_C1R, "state=optflow_pyr_" #t " state=optflow_pyr_" #t                \
                                              " blk=64 blk=64 blk=16 blk=64 =8 =5 =1 =10 =0.01 state=optflow_" #t)

TORTURE_FAMILY(optflow) {
  return {
      OPTFLOW_LINES(8u),
      OPTFLOW_LINES(16u),
      OPTFLOW_LINES(32f),
  };
}
