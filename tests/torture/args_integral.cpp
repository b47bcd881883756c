// Torture table: integral images and rectangle deviations. Integrals have
// one (tilted: two) more columns and rows than the source; the rectangle
// deviations read rect.x + rect.width more columns and the rows below.
#include "torture/torture.h"

TORTURE_FAMILY(integral) {
  return {
      TORTURE(zeliIntegral_8u32s_C1R, "in1 out1:w+1:h+1 roi =3"),
      TORTURE(zeliIntegral_8u32f_C1R, "in1 out1:w+1:h+1 roi =3"),
      TORTURE(zeliIntegral_32f_C1R, "in1 out1:w+1:h+1 roi"),
      TORTURE(zeliSqrIntegral_8u32s_C1R, "in1 out1:w+1:h+1 out1:w+1:h+1 roi =3 =9"),
      TORTURE(zeliSqrIntegral_8u32s64f_C1R, "in1 out1:w+1:h+1 out1:w+1:h+1 roi =3 =9"),
      TORTURE(zeliSqrIntegral_8u32f64f_C1R, "in1 out1:w+1:h+1 out1:w+1:h+1 roi =3 =9"),
      TORTURE(zeliTiltedIntegral_8u32f_C1R, "in1 out1:w+2:h+2 roi =3"),
      TORTURE(zeliTiltedIntegral_8u32s_C1R, "in1 out1:w+2:h+2 roi =3"),
      // These read the pixel just right of the ROI in every row.
      TORTURE(zeliTiltedSqrIntegral_8u32s_C1R, "in1:r+1 out1:w+2:h+2 out1:w+2:h+2 roi =3 =9"),
      TORTURE(zeliTiltedSqrIntegral_8u32s64f_C1R, "in1:r+1 out1:w+2:h+2 out1:w+2:h+2 roi =3 =9"),
      TORTURE(zeliTiltedSqrIntegral_8u32f64f_C1R, "in1:r+1 out1:w+2:h+2 out1:w+2:h+2 roi =3 =9"),
      TORTURE(zeliRectStdDev_32f_C1R, "in1:w+1:h+1 in1:w+1:h+1 out1 roi rect=0,0,1,1"),
      TORTURE(zeliRectStdDev_32s32f_C1R, "in1:w+1:h+1 in1:w+1:h+1 out1 roi rect=0,0,1,1"),
      TORTURE(zeliRectStdDev_32s_C1RSfs, "in1:w+1:h+1 in1:w+1:h+1 out1 roi rect=0,0,1,1 =1"),
      TORTURE(zeliTiltedRectStdDev_32f_C1R, "in1:w+2:h+2 in1:w+2:h+2 out1 roi rect=1,0,1,1"),
      TORTURE(zeliTiltedRectStdDev_32s32f_C1R, "in1:w+2:h+2 in1:w+2:h+2 out1 roi rect=1,0,1,1"),
      TORTURE(zeliTiltedRectStdDev_32s_C1RSfs, "in1:w+2:h+2 in1:w+2:h+2 out1 roi rect=1,0,1,1 =1"),
  };
}
