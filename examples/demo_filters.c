/* Derivative and smoothing step: the gradient magnitude |dx| + |dy| from the
 * 3x3 Scharr derivatives (8u -> 16s, replicated borders), scaled to 8 bits, and
 * the picture smoothed by a 9x9 Gaussian with sigma 2, written as
 * filters_gradient.pgm and filters_gaussian.pgm. */
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"

static int gradientStep(const DemoImage* image, const char* outDir) {
  ZeliSize roi = {image->width, image->height};
  int bytes = 0;
  if (demoCheck("zeliFilterScharrVertGetBufferSize_8u16s_C1R",
                zeliFilterScharrVertGetBufferSize_8u16s_C1R(roi, zelMaskSize3x3, &bytes)))
    return 1;
  size_t count = (size_t)image->width * image->height;
  Zel16s* dx = (Zel16s*)malloc(count * sizeof(Zel16s));
  Zel16s* dy = (Zel16s*)malloc(count * sizeof(Zel16s));
  Zel8u* buffer = (Zel8u*)malloc((size_t)bytes);
  DemoImage out = demoAllocImage(image->width, image->height);
  int failures = 1;
  if (dx && dy && buffer && out.pixels) {
    int step = image->width * (int)sizeof(Zel16s);
    /* Both Scharr members take a buffer of the same size. */
    failures = demoCheck("zeliFilterScharrVertBorder_8u16s_C1R",
                         zeliFilterScharrVertBorder_8u16s_C1R(image->pixels, image->step, dx, step, roi,
                                                              zelMaskSize3x3, zelBorderReplicate, 0, buffer));
    if (!failures)
      failures = demoCheck("zeliFilterScharrHorizBorder_8u16s_C1R",
                           zeliFilterScharrHorizBorder_8u16s_C1R(image->pixels, image->step, dy, step, roi,
                                                                 zelMaskSize3x3, zelBorderReplicate, 0, buffer));
    if (!failures) {
      int peak = 1;
      for (size_t i = 0; i < count; ++i) {
        int m = abs(dx[i]) + abs(dy[i]);
        if (m > peak) peak = m;
      }
      for (int y = 0; y < image->height; ++y)
        for (int x = 0; x < image->width; ++x) {
          size_t i = (size_t)y * image->width + x;
          int m = abs(dx[i]) + abs(dy[i]);
          out.pixels[y * out.step + x] = (Zel8u)(m * 255 / peak);
        }
      printf("filters: gradient magnitude peak %d\n", peak);
      failures = demoWritePgm(outDir, "filters_gradient.pgm", out.pixels, out.step, out.width, out.height);
    }
  }
  free(dx);
  free(dy);
  free(buffer);
  demoFreeImage(&out);
  return failures;
}

static int gaussianStep(const DemoImage* image, const char* outDir) {
  ZeliSize roi = {image->width, image->height};
  int stateBytes = 0, bufferBytes = 0;
  if (demoCheck("zeliFilterGaussianGetBufferSize",
                zeliFilterGaussianGetBufferSize(roi, 9, zel8u, 1, &stateBytes, &bufferBytes)))
    return 1;
  Zel8u* state = (Zel8u*)malloc((size_t)stateBytes);
  Zel8u* buffer = (Zel8u*)malloc((size_t)bufferBytes);
  DemoImage out = demoAllocImage(image->width, image->height);
  int failures = 1;
  if (state && buffer && out.pixels) {
    ZeliFilterGaussianState* gaussian = (ZeliFilterGaussianState*)state;
    failures = demoCheck("zeliFilterGaussianInit", zeliFilterGaussianInit(roi, 2.0f, 9, zel8u, 1, gaussian));
    if (!failures)
      failures = demoCheck("zeliFilterGaussianBorder_8u_C1R",
                           zeliFilterGaussianBorder_8u_C1R(image->pixels, image->step, out.pixels, out.step, roi,
                                                           zelBorderMirror, 0, gaussian, buffer));
    if (!failures) failures = demoWritePgm(outDir, "filters_gaussian.pgm", out.pixels, out.step, out.width, out.height);
  }
  free(state);
  free(buffer);
  demoFreeImage(&out);
  return failures;
}

int demoFilters(const DemoImage* image, const char* outDir) {
  return gradientStep(image, outDir) | gaussianStep(image, outDir);
}
