// Torture table: compound morphology. States from a 3 x 3 element for the
// ROI of the images; a wider ROI or a height whose intermediate image cannot
// fit gives -6 (roi:W:H), whatever the border.
#include <cstring>

#include "torture/torture.h"

namespace {

Zel8u kSquare[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};

using GetSize = ZelStatus(ZELCV_CALL*)(ZeliSize, ZeliSize, int*, int*);
using Init = ZelStatus(ZELCV_CALL*)(ZeliSize, Zel8u*, ZeliSize, ZeliMorphAdvState*, Zel8u*);

// Init reflects the caller's mask in place while it works, so threads that
// build states at once each need their own copy.
Zel8u* ownMask(zeltorture::Arena& a) {
  auto* mask = static_cast<Zel8u*>(a.block(sizeof kSquare));
  std::memcpy(mask, kSquare, sizeof kSquare);
  return mask;
}

zeltorture::Maker compound(GetSize getSize, Init init) {
  return {[=](zeltorture::Arena& a, ZeliSize roi) -> void* {
            int stateSize = 0, bufferSize = 0;
            if (getSize(roi, {3, 3}, &stateSize, &bufferSize)) return nullptr;
            auto* state = static_cast<ZeliMorphAdvState*>(a.block(size_t(stateSize)));
            auto* buffer = static_cast<Zel8u*>(a.block(size_t(bufferSize)));
            return init(roi, ownMask(a), {3, 3}, state, buffer) ? nullptr : state;
          },
          nullptr};
}

}  // namespace

#define MAKER(t) TORTURE_MAKER(morphadv_##t, compound(zeliMorphAdvGetSize_##t, zeliMorphAdvInit_##t))
MAKER(8u_C1R); MAKER(8u_C3R); MAKER(8u_C4R); MAKER(32f_C1R); MAKER(32f_C3R); MAKER(32f_C4R);
MAKER(16u_C1R); MAKER(16s_C1R); MAKER(1u_C1R);

TORTURE_MAKER(morphadv,
              [](zeltorture::Arena& a, ZeliSize roi) -> void* {
                ZeliMorphAdvState* s = nullptr;
                return zeliMorphAdvInitAlloc_8u_C1R(&s, roi, ownMask(a), {3, 3}, {1, 1}) ? nullptr : s;
              },
              [](void* p) { zeliMorphAdvFree(static_cast<ZeliMorphAdvState*>(p)); });

#define BORDERS "border=1,6,0x31,0x11,0x21,0xF1"
#define OPS(t, images, value)                                                                      \
  TORTURE(zeliMorphAdvGetSize_##t, "roi sz=3x3 res res"),                                          \
  TORTURE(zeliMorphAdvInit_##t, "roi arr=9,1 sz=3x3 blk blk"),                                     \
  TORTURE(zeliMorphOpenBorder_##t, images " roi:W:H " BORDERS " " value " state=morphadv_" #t " buf"),      \
  TORTURE(zeliMorphCloseBorder_##t, images " roi:W:H " BORDERS " " value " state=morphadv_" #t " buf"),     \
  TORTURE(zeliMorphTophatBorder_##t, images " roi:W:H " BORDERS " " value " state=morphadv_" #t " buf"),    \
  TORTURE(zeliMorphBlackhatBorder_##t, images " roi:W:H " BORDERS " " value " state=morphadv_" #t " buf"),  \
  TORTURE(zeliMorphGradientBorder_##t, images " roi:W:H " BORDERS " " value " state=morphadv_" #t " buf")
#define ALLOC(t) TORTURE(zeliMorphAdvInitAlloc_##t, "new=morphadv roi arr=9,1 sz=3x3 pt=1,1")

TORTURE_FAMILY(morph_adv) {
  return {
      OPS(8u_C1R, "in1 out1", "=0"), OPS(8u_C3R, "in3 out3", "arr?=3,0"), OPS(8u_C4R, "in4 out4", "arr?=4,0"),
      OPS(32f_C1R, "in1:na out1:na", "=0"), OPS(32f_C3R, "in3:na out3:na", "arr?=3,0"),
      OPS(32f_C4R, "in4:na out4:na", "arr?=4,0"), OPS(16u_C1R, "in1 out1", "=0"), OPS(16s_C1R, "in1 out1", "=0"),
      OPS(1u_C1R, "bin bout", "=0"),
      ALLOC(8u_C1R), ALLOC(8u_C3R), ALLOC(8u_C4R), ALLOC(32f_C1R), ALLOC(32f_C3R), ALLOC(32f_C4R),
      TORTURE(zeliMorphAdvFree, "obj=morphadv"),
  };
}
