// Torture table: the version query and the shared release routines.
#include "torture/torture.h"
#include "zelcore.h"

// A single block as the support library hands it out, for the routines
// that release one.
TORTURE_MAKER(block, [](zeltorture::Arena&, ZeliSize) { return zelMalloc(64); },
              [](void* p) { zelFree(p); });

TORTURE_FAMILY(base) {
  return {
      TORTURE(zelcvGetLibVersion, ""),
      TORTURE(zeliInpaintFree_8u_C1R, "obj=block"),
      TORTURE(zeliInpaintFree_8u_C3R, "obj=block"),
      TORTURE(zeliPyramidFree, "obj=block"),
      TORTURE(zeliPyramidLayerDownFree_8u_C1R, "obj=block"),
      TORTURE(zeliPyramidLayerDownFree_8u_C3R, "obj=block"),
      TORTURE(zeliPyramidLayerDownFree_16u_C1R, "obj=block"),
      TORTURE(zeliPyramidLayerDownFree_16u_C3R, "obj=block"),
      TORTURE(zeliPyramidLayerDownFree_32f_C1R, "obj=block"),
      TORTURE(zeliPyramidLayerDownFree_32f_C3R, "obj=block"),
      TORTURE(zeliPyramidLayerUpFree_8u_C1R, "obj=block"),
      TORTURE(zeliPyramidLayerUpFree_8u_C3R, "obj=block"),
      TORTURE(zeliPyramidLayerUpFree_16u_C1R, "obj=block"),
      TORTURE(zeliPyramidLayerUpFree_16u_C3R, "obj=block"),
      TORTURE(zeliPyramidLayerUpFree_32f_C1R, "obj=block"),
      TORTURE(zeliPyramidLayerUpFree_32f_C3R, "obj=block"),
  };
}
