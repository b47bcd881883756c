// Torture table: image pyramids. A reduction writes ((w + 1) / 2) x
// ((h + 1) / 2) pixels (:d2), an expansion 2w x 2h (:x2); the layer
// operations take the destination size as a second ROI, which at rate 2 is
// the same half or double of the source.
#include "torture/torture.h"

namespace {

const Zel16s kTaps16[5] = {1, 4, 6, 4, 1};
const Zel32f kTaps32[5] = {1, 4, 6, 4, 1};

template <typename Tap, typename Init, typename Free>
zeltorture::Maker layerMaker(Init init, Free release, const Tap* taps) {
  return zeltorture::Maker{[=](zeltorture::Arena&, ZeliSize roi) -> void* {
                             ZeliPyramidLayerState* st = nullptr;
                             return init(&st, roi, 2.0f, taps, 5, 2) == zelStatusOk ? st : nullptr;
                           },
                           [=](void* p) { release(static_cast<ZeliPyramidLayerState*>(p)); }};
}

}  // namespace

TORTURE_MAKER(pyramid,
              [](zeltorture::Arena&, ZeliSize roi) -> void* {
                ZeliPyramid* p = nullptr;
                return zeliPyramidInitAlloc(&p, 3, roi, 2.0f) == zelStatusOk ? p : nullptr;
              },
              [](void* p) { zeliPyramidFree(static_cast<ZeliPyramid*>(p)); });

#define LAYER_MAKERS(t, taps)                                                                                     \
  static const ::zeltorture::Registrar tortureMaker_layerdown_##t(                                               \
      "layerdown_" #t, layerMaker(zeliPyramidLayerDownInitAlloc_##t, zeliPyramidLayerDownFree_##t, taps));       \
  static const ::zeltorture::Registrar tortureMaker_layerup_##t(                                                 \
      "layerup_" #t, layerMaker(zeliPyramidLayerUpInitAlloc_##t, zeliPyramidLayerUpFree_##t, taps));
LAYER_MAKERS(8u_C1R, kTaps16)
LAYER_MAKERS(8u_C3R, kTaps16)
LAYER_MAKERS(16u_C1R, kTaps16)
LAYER_MAKERS(16u_C3R, kTaps16)
LAYER_MAKERS(32f_C1R, kTaps32)
LAYER_MAKERS(32f_C3R, kTaps32)
#undef LAYER_MAKERS

#define GAUSS(t, c)                                                  \
  TORTURE(zeliPyrDown_Gauss5x5_##t, "in" #c " out" #c ":d2 roi buf"), \
      TORTURE(zeliPyrUp_Gauss5x5_##t, "in" #c " out" #c ":x2 roi buf")
#define LAYER(t, c)                                                                                        \
  TORTURE(zeliPyramidLayerDownInitAlloc_##t, "new=layerdown_" #t " roi =2 arr=5,1 =5 =2"),                \
      TORTURE(zeliPyramidLayerUpInitAlloc_##t, "new=layerup_" #t " roi =2 arr=5,1 =5 =2"),                \
      TORTURE(zeliPyramidLayerDown_##t, "in" #c " roi:W out" #c ":d2 roi:d2 state=layerdown_" #t),        \
      TORTURE(zeliPyramidLayerUp_##t, "in" #c " roi:W out" #c ":x2 roi:x2 state=layerup_" #t)

TORTURE_FAMILY(pyramid) {
  return {
      TORTURE(zeliPyrDownGetBufSize_Gauss5x5, "roiw =1 =3 res"),
      TORTURE(zeliPyrUpGetBufSize_Gauss5x5, "roiw =13 =1 res"),
      GAUSS(8u_C1R, 1),
      GAUSS(8u_C3R, 3),
      GAUSS(8s_C1R, 1),
      GAUSS(8s_C3R, 3),
      GAUSS(32f_C1R, 1),
      GAUSS(32f_C3R, 3),
      TORTURE(zeliGetPyramidDownROI, "roi blk=8 =2"),
      TORTURE(zeliGetPyramidUpROI, "roi blk=8 blk=8 =2"),
      TORTURE(zeliPyramidInitAlloc, "new=pyramid =3 roi =2"),
      LAYER(8u_C1R, 1),
      LAYER(8u_C3R, 3),
      LAYER(16u_C1R, 1),
      LAYER(16u_C3R, 3),
      LAYER(32f_C1R, 1),
      LAYER(32f_C3R, 3),
  };
}
