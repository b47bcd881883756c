/* Optical flow: the demo picture and a copy moved by (2.6, -1.4) pixels
 * (a sub-pixel window copy), both reduced to three-level pyramids; points
 * on a grid are tracked from the first into the second. The picture shows
 * the first image dimmed, each tracked point's motion drawn four times
 * longer in white, and lost points (flat regions) as dark dots. */
#include <math.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include "demo.h"

enum { kLevels = 2, kWin = 15, kGrid = 16 };

/* Levels 1 .. top of a pyramid whose level 0 is `base`; 0 on success. */
static int fillPyramid(ZeliPyramid* p, Zel8u* base, int step, Zel8u* buffer) {
  p->images[0] = base;
  p->steps[0] = step;
  for (int i = 1; i <= p->level; ++i) {
    const ZeliSize s = p->roiSizes[i];
    p->steps[i] = s.width;
    p->images[i] = (Zel8u*)malloc((size_t)s.width * s.height);
    if (!p->images[i]) return 1;
    if (demoCheck("zeliPyrDown_Gauss5x5_8u_C1R",
                  zeliPyrDown_Gauss5x5_8u_C1R(p->images[i - 1], p->steps[i - 1], p->images[i], p->steps[i],
                                              p->roiSizes[i - 1], buffer)))
      return 1;
  }
  return 0;
}

static void plot(Zel8u* pixels, int step, int w, int h, int x, int y, Zel8u v) {
  if (x >= 0 && y >= 0 && x < w && y < h) pixels[(size_t)y * step + x] = v;
}

static void line(Zel8u* pixels, int step, int w, int h, float x0, float y0, float x1, float y1, Zel8u v) {
  const float dx = x1 - x0, dy = y1 - y0;
  const int n = (int)(fabsf(dx) > fabsf(dy) ? fabsf(dx) : fabsf(dy)) + 1;
  for (int i = 0; i <= n; ++i)
    plot(pixels, step, w, h, (int)lroundf(x0 + dx * i / n), (int)lroundf(y0 + dy * i / n), v);
}

int demoOptFlow(const DemoImage* image, const char* outDir) {
  const int w = image->width, h = image->height;
  const ZeliSize roi = {w, h};
  const float shiftX = 2.6f, shiftY = -1.4f;
  ZeliPyramid *first = NULL, *second = NULL;
  ZeliOptFlowPyrLKState* state = NULL;
  Zel8u *moved = NULL, *buffer = NULL, *picture = NULL;
  ZeliPoint_32f *prev = NULL, *next = NULL;
  Zel8s* status = NULL;
  Zel32f* error = NULL;
  int failures = 0, bytes = 0, count = 0, tracked = 0;

  failures |= demoCheck("zeliPyramidInitAlloc", zeliPyramidInitAlloc(&first, kLevels, roi, 2.0f));
  failures |= demoCheck("zeliPyramidInitAlloc", zeliPyramidInitAlloc(&second, kLevels, roi, 2.0f));
  failures |= demoCheck("zeliPyrDownGetBufSize_Gauss5x5", zeliPyrDownGetBufSize_Gauss5x5(w, zel8u, 1, &bytes));
  failures |= demoCheck("zeliOpticalFlowPyrLKInitAlloc_8u_C1R",
                        zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&state, roi, kWin, 0));
  const int maxPoints = (w / kGrid) * (h / kGrid) + 1;
  if (!failures) {
    moved = (Zel8u*)malloc((size_t)w * h);
    picture = (Zel8u*)malloc((size_t)w * h);
    buffer = (Zel8u*)malloc((size_t)bytes);
    prev = (ZeliPoint_32f*)malloc(sizeof *prev * (size_t)maxPoints);
    next = (ZeliPoint_32f*)malloc(sizeof *next * (size_t)maxPoints);
    status = (Zel8s*)malloc((size_t)maxPoints);
    error = (Zel32f*)malloc(sizeof *error * (size_t)maxPoints);
    if (!moved || !picture || !buffer || !prev || !next || !status || !error) {
      fprintf(stderr, "optical flow demo: out of memory\n");
      failures = 1;
    }
  }
  /* The moved copy: content at x appears at x + shift. */
  if (!failures)
    failures |= demoCheck("zeliCopySubpix_8u_C1R",
                          zeliCopySubpix_8u_C1R(image->pixels, image->step, roi, moved, w, roi,
                                                (ZeliPoint_32f){(w - 1) * 0.5f - shiftX, (h - 1) * 0.5f - shiftY}));
  if (!failures) failures |= fillPyramid(first, image->pixels, image->step, buffer);
  if (!failures) failures |= fillPyramid(second, moved, w, buffer);
  if (!failures) {
    for (int y = kGrid; y < h - kGrid / 2; y += kGrid)
      for (int x = kGrid; x < w - kGrid / 2; x += kGrid) {
        prev[count] = next[count] = (ZeliPoint_32f){(float)x, (float)y};
        ++count;
      }
    failures |= demoCheck("zeliOpticalFlowPyrLK_8u_C1R",
                          zeliOpticalFlowPyrLK_8u_C1R(first, second, prev, next, status, error, count, kWin, kLevels,
                                                      30, 0.01f, state));
  }
  if (!failures) {
    int near = 0; /* points that found the true motion within 0.1 pixel */
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) picture[(size_t)y * w + x] = (Zel8u)(image->pixels[(size_t)y * image->step + x] / 3);
    for (int i = 0; i < count; ++i) {
      if (status[i] != 0) {
        plot(picture, w, w, h, (int)prev[i].x, (int)prev[i].y, 0);
        continue;
      }
      ++tracked;
      near += fabsf(next[i].x - prev[i].x - shiftX) < 0.1f && fabsf(next[i].y - prev[i].y - shiftY) < 0.1f;
      line(picture, w, w, h, prev[i].x, prev[i].y, prev[i].x + 4 * (next[i].x - prev[i].x),
           prev[i].y + 4 * (next[i].y - prev[i].y), 255);
    }
    failures |= demoWritePgm(outDir, "optflow_vectors.pgm", picture, w, w, h);
    if (!failures)
      printf("  optical flow: %d of %d points tracked, %d within 0.1 pixel of the motion (%.1f, %.1f)\n", tracked,
             count, near, shiftX, shiftY);
  }
  for (int i = 1; first && i <= first->level; ++i) free(first->images[i]);
  for (int i = 1; second && i <= second->level; ++i) free(second->images[i]);
  if (first) zeliPyramidFree(first);
  if (second) zeliPyramidFree(second);
  if (state) zeliOpticalFlowPyrLKFree_8u_C1R(state);
  free(moved);
  free(picture);
  free(buffer);
  free(prev);
  free(next);
  free(status);
  free(error);
  return failures;
}
