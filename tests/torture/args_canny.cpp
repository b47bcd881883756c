// Torture table: the Canny edge detector. Sizes whose work buffer would not
// fit in an int are refused with -6 (roi:L).
#include "torture/torture.h"

TORTURE_FAMILY(canny) {
  return {
      TORTURE(zeliCannyGetSize, "roi res"),
      TORTURE(zeliCannyBorderGetSize, "roi =2 =33 =4 res"),
      TORTURE(zeliCanny_16s8u_C1R, "in1 in1 out1 roi:L =10 =20 buf"),
      TORTURE(zeliCanny_32f8u_C1R, "in1 in1 out1 roi:L =10 =20 buf"),
      TORTURE(zeliCannyBorder_8u_C1R, "in1 out1 roi:L =2 =33 border=1,6,0x31 =0 =10 =20 =4 buf"),
  };
}
