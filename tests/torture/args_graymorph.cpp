// Torture table: grey-level morphology and reconstruction. Grey states come
// from a 3 x 3 function for the ROI width of the images; a wider ROI gives
// -6 (roi:W). Reconstruction refuses ROIs whose buffer would not fit in an
// int (roi:L).
#include "torture/torture.h"

namespace {

const Zel32s kValues8u[9] = {0, 1, 0, 1, 2, 1, 0, 1, 0};
const Zel32f kValues32f[9] = {0, 1, 0, 1, 2, 1, 0, 1, 0};

template <typename V>
zeltorture::Maker inCaller(ZelStatus(ZELCV_CALL* getSize)(int, ZeliSize, int*),
                           ZelStatus(ZELCV_CALL* init)(int, const V*, ZeliSize, ZeliPoint, ZeliMorphGrayState*),
                           const V* values) {
  return {[=](zeltorture::Arena& a, ZeliSize roi) -> void* {
            int size = 0;
            if (getSize(roi.width, {3, 3}, &size)) return nullptr;
            auto* state = static_cast<ZeliMorphGrayState*>(a.block(size_t(size)));
            return init(roi.width, values, {3, 3}, {1, 1}, state) ? nullptr : state;
          },
          nullptr};
}

}  // namespace

TORTURE_MAKER(gray_8u_C1R, inCaller<Zel32s>(zeliMorphGrayGetSize_8u_C1R, zeliMorphGrayInit_8u_C1R, kValues8u));
TORTURE_MAKER(gray_32f_C1R, inCaller<Zel32f>(zeliMorphGrayGetSize_32f_C1R, zeliMorphGrayInit_32f_C1R, kValues32f));
TORTURE_MAKER(grayalloc_8u_C1R,
              [](zeltorture::Arena&, ZeliSize roi) -> void* {
                ZeliMorphGrayState* s = nullptr;
                return zeliMorphGrayInitAlloc_8u_C1R(roi.width, kValues8u, {3, 3}, {1, 1}, &s) ? nullptr : s;
              },
              [](void* p) { zeliMorphGrayFree_8u_C1R(static_cast<ZeliMorphGrayState*>(p)); });
TORTURE_MAKER(grayalloc_32f_C1R,
              [](zeltorture::Arena&, ZeliSize roi) -> void* {
                ZeliMorphGrayState* s = nullptr;
                return zeliMorphGrayInitAlloc_32f_C1R(roi.width, kValues32f, {3, 3}, {1, 1}, &s) ? nullptr : s;
              },
              [](void* p) { zeliMorphGrayFree_32f_C1R(static_cast<ZeliMorphGrayState*>(p)); });

#define GRAY(t)                                                                                      \
  TORTURE(zeliMorphGrayGetSize_##t, "roiw sz=3x3 res"),                                              \
  TORTURE(zeliMorphGrayInit_##t, "roiw arr=9,1 sz=3x3 pt=1,1 blk"),                                  \
  TORTURE(zeliMorphGrayInitAlloc_##t, "roiw arr=9,1 sz=3x3 pt=1,1 new=grayalloc_" #t),              \
  TORTURE(zeliMorphGrayFree_##t, "obj=grayalloc_" #t),                                               \
  TORTURE(zeliGrayDilateBorder_##t, "in1 out1 roi:W border=1,6,0x31,0xF1 state=gray_" #t),           \
  TORTURE(zeliGrayErodeBorder_##t, "in1 out1 roi:W border=1,6,0x31,0xF1 state=gray_" #t)
#define RECONSTRUCT(t)                                                                               \
  TORTURE(zeliMorphReconstructGetBufferSize_##t##_C1, "roi:L res"),                                  \
  TORTURE(zeliMorphReconstructDilate_##t##_C1IR, "io1 in1 roi:L =1 buf"),                            \
  TORTURE(zeliMorphReconstructErode_##t##_C1IR, "io1 in1 roi:L =2 buf")

TORTURE_FAMILY(graymorph) {
  return {
      GRAY(8u_C1R), GRAY(32f_C1R),
      TORTURE(zeliMorphReconstructGetBufferSize, "roi:L =1 res"),
      RECONSTRUCT(8u), RECONSTRUCT(16u), RECONSTRUCT(32f), RECONSTRUCT(64f),
  };
}
