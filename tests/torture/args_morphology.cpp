// Torture table: flat morphology. States come from a 3 x 3 element for the
// ROI width of the images; a wider ROI gives -6 (roi:W). 32f steps are
// compared with the row bytes only (:na).
#include "torture/torture.h"

namespace {

Zel8u kSquare[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};

using BorderGetSize = ZelStatus(ZELCV_CALL*)(int, ZeliSize, int*, int*);
using BorderInit = ZelStatus(ZELCV_CALL*)(int, const Zel8u*, ZeliSize, ZeliMorphState*, Zel8u*);
using OldGetSize = ZelStatus(ZELCV_CALL*)(int, const Zel8u*, ZeliSize, int*);
using OldInit = ZelStatus(ZELCV_CALL*)(int, const Zel8u*, ZeliSize, ZeliPoint, ZeliMorphState*);

zeltorture::Maker newer(BorderGetSize getSize, BorderInit init) {
  return {[=](zeltorture::Arena& a, ZeliSize roi) -> void* {
            int stateSize = 0, bufferSize = 0;
            if (getSize(roi.width, {3, 3}, &stateSize, &bufferSize)) return nullptr;
            auto* state = static_cast<ZeliMorphState*>(a.block(size_t(stateSize)));
            return init(roi.width, kSquare, {3, 3}, state, nullptr) ? nullptr : state;
          },
          nullptr};
}

zeltorture::Maker older(OldGetSize getSize, OldInit init) {
  return {[=](zeltorture::Arena& a, ZeliSize roi) -> void* {
            int stateSize = 0;
            if (getSize(roi.width, kSquare, {3, 3}, &stateSize)) return nullptr;
            auto* state = static_cast<ZeliMorphState*>(a.block(size_t(stateSize)));
            return init(roi.width, kSquare, {3, 3}, {1, 1}, state) ? nullptr : state;
          },
          nullptr};
}

}  // namespace

#define NEWER(t) TORTURE_MAKER(morph_##t, newer(zeliMorphologyBorderGetSize_##t, zeliMorphologyBorderInit_##t))
#define OLDER(t) TORTURE_MAKER(morphold_##t, older(zeliMorphologyGetSize_##t, zeliMorphologyInit_##t))
NEWER(8u_C1R); NEWER(8u_C3R); NEWER(8u_C4R); NEWER(32f_C1R); NEWER(32f_C3R); NEWER(32f_C4R);
NEWER(16u_C1R); NEWER(16s_C1R); NEWER(1u_C1R);
OLDER(8u_C1R); OLDER(8u_C3R); OLDER(8u_C4R); OLDER(32f_C1R); OLDER(32f_C3R); OLDER(32f_C4R);

TORTURE_MAKER(morphology,
              [](zeltorture::Arena&, ZeliSize roi) -> void* {
                ZeliMorphState* s = nullptr;
                return zeliMorphologyInitAlloc_8u_C1R(roi.width, kSquare, {3, 3}, {1, 1}, &s) ? nullptr : s;
              },
              [](void* p) { zeliMorphologyFree(static_cast<ZeliMorphState*>(p)); });

// The one-channel state size follows from the sizes alone (the mask is not
// read); three and four channels analyse the mask first and test the output
// pointer after it.
#define kGetSizeC1 "roiw arr?=9,1 sz=3x3 res"
#define kGetSizeC34 "roiw arr=9,1 sz=3x3 res:@s"

// Per type and channels: max/min filters, their queries, the older and the
// newer dilation and erosion with their states.
#define FILTERS(t, c, na, getSize)                                                                             \
  TORTURE(zeliFilterMaxBorderReplicate_##t, "in" #c " out" #c " roi sz=3x3 pt=1,1 buf"),                \
  TORTURE(zeliFilterMinBorderReplicate_##t, "in" #c " out" #c " roi sz=3x3 pt=1,1 buf"),                \
  TORTURE(zeliFilterMaxGetBufferSize_##t, "roiw sz=3x3 res"),                                           \
  TORTURE(zeliFilterMinGetBufferSize_##t, "roiw sz=3x3 res"),                                           \
  TORTURE(zeliMorphologyGetSize_##t, getSize),                                                          \
  TORTURE(zeliMorphologyInit_##t, "roiw arr=9,1 sz=3x3 pt=1,1 blk:@s"),                                 \
  TORTURE(zeliMorphologyInitAlloc_##t, "roiw arr=9,1 sz=3x3 pt=1,1 new=morphology:@s"),                 \
  TORTURE(zeliDilateBorderReplicate_##t, "in" #c na " out" #c na " roi:W border=1 state=morphold_" #t), \
  TORTURE(zeliErodeBorderReplicate_##t, "in" #c na " out" #c na " roi:W border=1 state=morphold_" #t)
#define BORDERED(t, c, na, value)                                                                     \
  TORTURE(zeliMorphologyBorderGetSize_##t, "roiw sz=3x3 res res"),                                    \
  TORTURE(zeliMorphologyBorderInit_##t, "roiw arr=9,1 sz=3x3 blk:@s null"),                           \
  TORTURE(zeliDilateBorder_##t,                                                                       \
          "in" #c na " out" #c na " roi:W border=1,6,0x31,0xF1 " value " state=morph_" #t " buf"),    \
  TORTURE(zeliErodeBorder_##t,                                                                        \
          "in" #c na " out" #c na " roi:W border=1,6,0x31,0xF1 " value " state=morph_" #t " buf")

TORTURE_FAMILY(morphology) {
  return {
      FILTERS(8u_C1R, 1, "", kGetSizeC1), FILTERS(8u_C3R, 3, "", kGetSizeC34), FILTERS(8u_C4R, 4, "", kGetSizeC34),
      FILTERS(32f_C1R, 1, ":na", kGetSizeC1), FILTERS(32f_C3R, 3, ":na", kGetSizeC34),
      FILTERS(32f_C4R, 4, ":na", kGetSizeC34),
      BORDERED(8u_C1R, 1, "", "=0"), BORDERED(8u_C3R, 3, "", "arr?=3,0"),
      BORDERED(8u_C4R, 4, "", "arr?=4,0"), BORDERED(32f_C1R, 1, ":na", "=0"),
      BORDERED(32f_C3R, 3, ":na", "arr?=3,0"), BORDERED(32f_C4R, 4, ":na", "arr?=4,0"),
      BORDERED(16u_C1R, 1, "", "=0"), BORDERED(16s_C1R, 1, "", "=0"),
      TORTURE(zeliMorphologyBorderGetSize_1u_C1R, "roiw sz=3x3 res res"),
      TORTURE(zeliMorphologyBorderInit_1u_C1R, "roiw arr=9,1 sz=3x3 blk:@s null"),
      TORTURE(zeliDilateBorder_1u_C1R, "bin bout roi:W border=1,6,0x31,0xF1 =0 state=morph_1u_C1R buf"),
      TORTURE(zeliErodeBorder_1u_C1R, "bin bout roi:W border=1,6,0x31,0xF1 =0 state=morph_1u_C1R buf"),
      TORTURE(zeliMorphologyFree, "obj=morphology"),
  };
}
