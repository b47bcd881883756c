// Torture table: lens undistortion. The resampling takes the source size and
// the destination size as two ROIs, both the tested one; its coordinate maps
// are 32f images read like the source.
#include "torture/torture.h"

#define UNDISTORT(t, c)                                                                                   \
  TORTURE(zeliUndistortRadial_##t, "in" #c " out" #c " roi =9 =8 =6 =3 =0.1 =0.01 =0.001 =-0.002 buf"), \
      TORTURE(zeliRemapBilinear_##t, "in" #c " roi in1 in1 out" #c " roi")

TORTURE_FAMILY(undistort) {
  return {
      TORTURE(zeliUndistortGetSize, "roi res"),
      TORTURE(zeliCreateMapCameraUndistort_32f_C1R, "out1 out1 roi arr=4,7 arr=4,0.01"),
      UNDISTORT(8u_C1R, 1),
      UNDISTORT(8u_C3R, 3),
      UNDISTORT(32f_C1R, 1),
      UNDISTORT(32f_C3R, 3),
  };
}
