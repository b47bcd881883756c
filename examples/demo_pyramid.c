/* Image pyramids: a three-level record at rate 2, each level made from the one
 * below by the Gaussian 5x5 reduction and written as a picture. */
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"

int demoPyramid(const DemoImage* image, const char* outDir) {
  ZeliPyramid* pyramid = NULL;
  Zel8u* buffer = NULL;
  int failures = demoCheck("zeliPyramidInitAlloc",
                           zeliPyramidInitAlloc(&pyramid, 2, (ZeliSize){image->width, image->height}, 2.0f));
  if (failures) return failures;
  int bytes = 0;
  failures |= demoCheck("zeliPyrDownGetBufSize_Gauss5x5",
                        zeliPyrDownGetBufSize_Gauss5x5(image->width, zel8u, 1, &bytes));
  buffer = failures ? NULL : (Zel8u*)malloc((size_t)bytes);
  if (!failures && !buffer) {
    fprintf(stderr, "pyramid demo: out of memory\n");
    failures = 1;
  }
  /* Level 0 is the picture itself; the caller owns every level's pixels. */
  pyramid->images[0] = image->pixels;
  pyramid->steps[0] = image->step;
  for (int i = 1; i <= pyramid->level && !failures; ++i) {
    const ZeliSize s = pyramid->roiSizes[i];
    pyramid->steps[i] = s.width;
    pyramid->images[i] = (Zel8u*)malloc((size_t)s.width * s.height);
    if (!pyramid->images[i]) {
      fprintf(stderr, "pyramid demo: out of memory\n");
      failures = 1;
      break;
    }
    failures |= demoCheck("zeliPyrDown_Gauss5x5_8u_C1R",
                          zeliPyrDown_Gauss5x5_8u_C1R(pyramid->images[i - 1], pyramid->steps[i - 1],
                                                      pyramid->images[i], pyramid->steps[i],
                                                      pyramid->roiSizes[i - 1], buffer));
  }
  for (int i = 0; i <= pyramid->level && !failures; ++i) {
    char name[32];
    snprintf(name, sizeof name, "pyramid_level%d.pgm", i);
    failures |= demoWritePgm(outDir, name, pyramid->images[i], pyramid->steps[i], pyramid->roiSizes[i].width,
                             pyramid->roiSizes[i].height);
  }
  if (!failures)
    printf("  pyramid: %d levels, top %d x %d at scale %g\n", pyramid->level + 1,
           pyramid->roiSizes[pyramid->level].width, pyramid->roiSizes[pyramid->level].height,
           pyramid->scales[pyramid->level]);
  for (int i = 1; i <= pyramid->level; ++i) free(pyramid->images[i]);
  free(buffer);
  zeliPyramidFree(pyramid);
  return failures;
}
