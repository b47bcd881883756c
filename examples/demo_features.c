/* Features step: FAST corners (16-pixel circle, arc 9, threshold 25, with
 * suppression) and the ten strongest Hough lines of the picture's Canny edges,
 * drawn over a dimmed copy of the picture (lines white, corners as black
 * crosses), written as features.pgm. */
#include <math.h>
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"

enum { kMaxLines = 10 };

static void drawLine(DemoImage* out, float rho, float theta) {
  const double c = cos((double)theta), s = sin((double)theta);
  /* x cos + y sin = rho: step along the axis the line runs closer to. */
  if (fabs(s) > fabs(c)) {
    for (int x = 0; x < out->width; ++x) {
      const int y = (int)lround((rho - x * c) / s);
      if (y >= 0 && y < out->height) out->pixels[y * out->step + x] = 255;
    }
  } else {
    for (int y = 0; y < out->height; ++y) {
      const int x = (int)lround((rho - y * s) / c);
      if (x >= 0 && x < out->width) out->pixels[y * out->step + x] = 255;
    }
  }
}

static void drawCross(DemoImage* out, int x, int y) {
  for (int d = -2; d <= 2; ++d) {
    if (x + d >= 0 && x + d < out->width) out->pixels[y * out->step + x + d] = 0;
    if (y + d >= 0 && y + d < out->height) out->pixels[(y + d) * out->step + x] = 0;
  }
}

int demoFeatures(const DemoImage* image, const char* outDir) {
  const ZeliSize roi = {image->width, image->height};
  const ZeliPoint_32f delta = {1.0f, 3.14159265f / 180.0f};
  int cannyBytes = 0, houghBytes = 0, fastBytes = 0, stateBytes = 0;
  if (demoCheck("zeliCannyBorderGetSize", zeliCannyBorderGetSize(roi, zelFilterSobel, zelMaskSize3x3, zelNormL2, &cannyBytes)) ||
      demoCheck("zeliHoughLineGetSize_8u_C1R", zeliHoughLineGetSize_8u_C1R(roi, delta, &houghBytes)) ||
      demoCheck("zeliFastNGetBufferSize", zeliFastNGetBufferSize(roi, &fastBytes)) ||
      demoCheck("zeliFastNGetSize", zeliFastNGetSize(&stateBytes)))
    return 1;
  DemoImage edges = demoAllocImage(image->width, image->height);
  DemoImage corner = demoAllocImage(image->width, image->height);
  DemoImage score = demoAllocImage(image->width, image->height);
  DemoImage picture = demoAllocImage(image->width, image->height);
  Zel8u* cannyBuffer = (Zel8u*)malloc((size_t)cannyBytes);
  Zel8u* houghBuffer = (Zel8u*)malloc((size_t)houghBytes);
  Zel8u* fastBuffer = (Zel8u*)malloc((size_t)fastBytes);
  ZeliFastNState* state = (ZeliFastNState*)malloc((size_t)stateBytes);
  const int capacity = image->width * image->height / 8 + 1;
  ZeliPoint* points = (ZeliPoint*)malloc(sizeof(ZeliPoint) * (size_t)capacity);
  Zel8u* scores = (Zel8u*)malloc((size_t)capacity);
  ZeliPoint_32f lines[kMaxLines];
  int failures = 1;
  if (edges.pixels && corner.pixels && score.pixels && picture.pixels && cannyBuffer && houghBuffer && fastBuffer &&
      state && points && scores) {
    int lineCount = 0, cornerCount = 0;
    ZelStatus houghStatus = zelStatusOk;
    failures = demoCheck("zeliCannyBorder_8u_C1R",
                         zeliCannyBorder_8u_C1R(image->pixels, image->step, edges.pixels, edges.step, roi,
                                                zelFilterSobel, zelMaskSize3x3, zelBorderReplicate, 0, 60.0f, 150.0f,
                                                zelNormL2, cannyBuffer));
    if (!failures) {
      houghStatus = zeliHoughLine_8u32f_C1R(edges.pixels, edges.step, roi, delta, 60, lines, kMaxLines, &lineCount,
                                            houghBuffer);
      /* More lines than asked for is expected: the strongest ones come first. */
      if (houghStatus != zelStatusOutputFull) failures = demoCheck("zeliHoughLine_8u32f_C1R", houghStatus);
    }
    if (!failures) failures = demoCheck("zeliFastNInit", zeliFastNInit(3, 9, 25, 1, state));
    if (!failures)
      failures = demoCheck("zeliFastN_8u_C1R",
                           zeliFastN_8u_C1R(image->pixels, image->step, corner.pixels, corner.step, score.pixels,
                                            score.step, roi, state, fastBuffer));
    if (!failures)
      failures = demoCheck("zeliFastN2DToVec_8u",
                           zeliFastN2DToVec_8u(corner.pixels, corner.step, score.pixels, score.step, roi, points,
                                               scores, capacity, &cornerCount));
    if (!failures) {
      for (int y = 0; y < image->height; ++y)
        for (int x = 0; x < image->width; ++x)
          picture.pixels[y * picture.step + x] = (Zel8u)(64 + image->pixels[y * image->step + x] / 2);
      for (int i = 0; i < lineCount; ++i) drawLine(&picture, lines[i].x, lines[i].y);
      for (int i = 0; i < cornerCount; ++i) drawCross(&picture, points[i].x, points[i].y);
      printf("features: %d FAST corners, %d Hough lines drawn\n", cornerCount, lineCount);
      failures = demoWritePgm(outDir, "features.pgm", picture.pixels, picture.step, picture.width, picture.height);
    }
  }
  free(scores);
  free(points);
  free(state);
  free(fastBuffer);
  free(houghBuffer);
  free(cannyBuffer);
  demoFreeImage(&picture);
  demoFreeImage(&score);
  demoFreeImage(&corner);
  demoFreeImage(&edges);
  return failures;
}
