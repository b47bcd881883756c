/* Distance step: the demo picture's Canny edges become the features (edge
 * pixels set to 0), and the exact Euclidean distance to the nearest edge is
 * written as a picture, 4 grey levels per pixel of distance, saturated. */
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"

int demoDistance(const DemoImage* image, const char* outDir) {
  const ZeliSize roi = {image->width, image->height};
  const int w = image->width, h = image->height;
  int cannyBytes = 0, distBytes = 0, failures = 0;
  if (demoCheck("zeliCannyBorderGetSize",
                zeliCannyBorderGetSize(roi, zelFilterSobel, zelMaskSize3x3, zelNormL2, &cannyBytes)) ||
      demoCheck("zeliTrueDistanceTransformGetBufferSize_8u32f_C1R",
                zeliTrueDistanceTransformGetBufferSize_8u32f_C1R(roi, &distBytes)))
    return 1;
  DemoImage edges = demoAllocImage(w, h);
  Zel8u* cannyBuffer = (Zel8u*)malloc((size_t)cannyBytes);
  Zel8u* distBuffer = (Zel8u*)malloc((size_t)distBytes);
  Zel32f* dist = (Zel32f*)malloc(sizeof(Zel32f) * (size_t)w * h);
  if (!edges.pixels || !cannyBuffer || !distBuffer || !dist) {
    fprintf(stderr, "distance demo: out of memory\n");
    failures = 1;
    goto done;
  }
  failures = demoCheck("zeliCannyBorder_8u_C1R",
                       zeliCannyBorder_8u_C1R(image->pixels, image->step, edges.pixels, edges.step, roi,
                                              zelFilterSobel, zelMaskSize3x3, zelBorderReplicate, 0, 60.0f,
                                              150.0f, zelNormL2, cannyBuffer));
  if (failures) goto done;
  /* Edges (255) become the 0 pixels the distance is measured to. */
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) edges.pixels[y * edges.step + x] = edges.pixels[y * edges.step + x] ? 0 : 1;
  failures = demoCheck("zeliTrueDistanceTransform_8u32f_C1R",
                       zeliTrueDistanceTransform_8u32f_C1R(edges.pixels, edges.step, dist, w * (int)sizeof(Zel32f),
                                                           roi, distBuffer));
  if (failures) goto done;
  {
    float peak = 0.0f;
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        const float d = dist[y * w + x];
        if (d > peak) peak = d;
        edges.pixels[y * edges.step + x] = (Zel8u)(d * 4.0f >= 255.0f ? 255 : (int)(d * 4.0f + 0.5f));
      }
    printf("  distance: farthest pixel %.2f from an edge\n", peak);
  }
  failures = demoWritePgm(outDir, "distance_euclidean.pgm", edges.pixels, edges.step, w, h);

done:
  free(dist);
  free(distBuffer);
  free(cannyBuffer);
  demoFreeImage(&edges);
  return failures;
}
