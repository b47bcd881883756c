/* Canny step: edges of the demo picture with the 3x3 Sobel kernel and the L2
 * norm, replicated borders, written as canny_edges.pgm. */
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"

int demoCanny(const DemoImage* image, const char* outDir) {
  ZeliSize roi = {image->width, image->height};
  int bytes = 0;
  if (demoCheck("zeliCannyBorderGetSize", zeliCannyBorderGetSize(roi, zelFilterSobel, zelMaskSize3x3, zelNormL2, &bytes)))
    return 1;
  DemoImage edges = demoAllocImage(image->width, image->height);
  Zel8u* buffer = (Zel8u*)malloc((size_t)bytes);
  int failures = 1;
  if (edges.pixels && buffer) {
    failures = demoCheck("zeliCannyBorder_8u_C1R",
                         zeliCannyBorder_8u_C1R(image->pixels, image->step, edges.pixels, edges.step, roi,
                                                zelFilterSobel, zelMaskSize3x3, zelBorderReplicate, 0, 60.0f, 150.0f,
                                                zelNormL2, buffer));
    if (!failures) {
      long count = 0;
      for (int y = 0; y < edges.height; ++y)
        for (int x = 0; x < edges.width; ++x) count += edges.pixels[y * edges.step + x] != 0;
      printf("canny: %ld edge pixels\n", count);
      failures = demoWritePgm(outDir, "canny_edges.pgm", edges.pixels, edges.step, edges.width, edges.height);
    }
  }
  free(buffer);
  demoFreeImage(&edges);
  return failures;
}
