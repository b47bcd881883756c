/* Flood fill: floods the picture's background from its top-left corner with
 * the gradient criterion (each pixel within 2 grey levels of the neighbour it
 * is reached from), paints the region white and prints the record. */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include "demo.h"

int demoFloodFill(const DemoImage* image, const char* outDir) {
  const int w = image->width, h = image->height;
  const ZeliSize roi = {w, h};
  const ZeliPoint seed = {2, 2};
  DemoImage out = demoAllocImage(w, h);
  Zel8u* buffer = NULL;
  int bytes = 0, failures = 0;
  ZeliConnectedComp region;
  failures |= demoCheck("zeliFloodFillGetSize_Grad", zeliFloodFillGetSize_Grad(roi, &bytes));
  if (!failures) buffer = (Zel8u*)malloc((size_t)bytes);
  if (failures || !buffer || !out.pixels) {
    if (!failures) fprintf(stderr, "flood fill demo: out of memory\n");
    failures = 1;
    goto done;
  }
  for (int y = 0; y < h; ++y) memcpy(out.pixels + (size_t)y * out.step, image->pixels + (size_t)y * image->step, (size_t)w);
  failures |= demoCheck("zeliFloodFill_Grad8Con_8u_C1IR",
                        zeliFloodFill_Grad8Con_8u_C1IR(out.pixels, out.step, roi, seed, 255, 2, 2, &region, buffer));
  if (failures) goto done;
  printf("  flood fill from (%d, %d): area %.0f, value %.0f, rectangle x %d y %d %d x %d\n", seed.x, seed.y,
         region.area, region.value[0], region.rect.x, region.rect.y, region.rect.width, region.rect.height);
  failures |= demoWritePgm(outDir, "floodfill.pgm", out.pixels, out.step, w, h);

done:
  free(buffer);
  demoFreeImage(&out);
  return failures;
}
