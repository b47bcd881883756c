// Torture table: distance transforms. The exact and fast-marching transforms
// refuse, like their buffer queries, ROIs whose buffer would not fit in an
// int (roi:H).
#include "torture/torture.h"

TORTURE_FAMILY(distance) {
  return {
      TORTURE(zeliGetDistanceTransformMask_32s, "=5 =2 arr=3"),
      TORTURE(zeliGetDistanceTransformMask_32f, "=3 =1 arr=3"),
      TORTURE(zeliGetDistanceTransformMask, "=52 arr=3"),
      TORTURE(zeliDistanceTransform_3x3_8u_C1R, "in1 out1 roi arr=2,1"),
      TORTURE(zeliDistanceTransform_3x3_8u_C1IR, "io1 roi arr=2,1"),
      TORTURE(zeliDistanceTransform_3x3_8u16u_C1R, "in1 out1 roi arr=2,2"),
      TORTURE(zeliDistanceTransform_3x3_8u32f_C1R, "in1 out1 roi arr=2,1"),
      TORTURE(zeliDistanceTransform_5x5_8u_C1R, "in1 out1 roi arr=3,3"),
      TORTURE(zeliDistanceTransform_5x5_8u_C1IR, "io1 roi arr=3,1"),
      TORTURE(zeliDistanceTransform_5x5_8u16u_C1R, "in1 out1 roi arr=3,5"),
      TORTURE(zeliDistanceTransform_5x5_8u32f_C1R, "in1 out1 roi arr=3,2"),
      TORTURE(zeliTrueDistanceTransformGetBufferSize_8u32f_C1R, "roi res"),
      TORTURE(zeliTrueDistanceTransform_8u32f_C1R, "in1 out1 roi:H buf"),
      TORTURE(zeliFastMarchingGetBufferSize_8u32f_C1R, "roi res"),
      TORTURE(zeliFastMarching_8u32f_C1R, "in1 out1 roi:H =2.5 buf"),
  };
}
