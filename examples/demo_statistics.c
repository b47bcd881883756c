/* Masked statistics: the picture's pixels brighter than its mean form
 * regions; the largest (4-connected) becomes a mask, and the statistics of
 * the whole picture and of that region are printed side by side. The mask
 * is written as a picture too. */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include "demo.h"

/* Labels the 4-connected regions of non-zero pixels of `bright` in place
 * (labels from 2 up) and returns the label of the largest, 0 if none. */
static int largestRegion(Zel8u* bright, int w, int h, int* stack) {
  int best = 0, bestSize = 0, label = 1;
  for (int start = 0; start < w * h; ++start) {
    if (bright[start] != 1 || label == 255) continue;
    int top = 0, size = 0;
    ++label;
    bright[start] = (Zel8u)label;
    stack[top++] = start;
    while (top > 0) {
      const int p = stack[--top], x = p % w, y = p / w;
      const int next[4] = {x > 0 ? p - 1 : -1, x < w - 1 ? p + 1 : -1, y > 0 ? p - w : -1, y < h - 1 ? p + w : -1};
      ++size;
      for (int k = 0; k < 4; ++k)
        if (next[k] >= 0 && bright[next[k]] == 1) {
          bright[next[k]] = (Zel8u)label;
          stack[top++] = next[k];
        }
    }
    if (size > bestSize) {
      bestSize = size;
      best = label;
    }
  }
  return best;
}

typedef struct {
  Zel64f inf, l1, l2, mean, dev, lo, hi;
  ZeliPoint loAt, hiAt;
} Stats;

int demoStatistics(const DemoImage* image, const char* outDir) {
  const int w = image->width, h = image->height;
  const ZeliSize roi = {w, h};
  const Zel8u* src = image->pixels;
  const int step = image->step;
  DemoImage mask = demoAllocImage(w, h);
  Zel8u* bright = (Zel8u*)malloc((size_t)w * h);
  int* stack = (int*)malloc(sizeof(int) * (size_t)w * h);
  int failures = 0;
  Stats all, region;
  Zel64f mean = 0;
  if (!mask.pixels || !bright || !stack) {
    fprintf(stderr, "statistics demo: out of memory\n");
    failures = 1;
    goto done;
  }
  failures |= demoCheck("zeliMean_8u_C1R", zeliMean_8u_C1R(src, step, roi, &mean));
  if (failures) goto done;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) bright[y * w + x] = src[y * step + x] > mean ? 1 : 0;
  {
    const int label = largestRegion(bright, w, h, stack);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) mask.pixels[y * mask.step + x] = label && bright[y * w + x] == label ? 255 : 0;
  }

  failures |= demoCheck("zeliNorm_Inf_8u_C1R", zeliNorm_Inf_8u_C1R(src, step, roi, &all.inf));
  failures |= demoCheck("zeliNorm_L1_8u_C1R", zeliNorm_L1_8u_C1R(src, step, roi, &all.l1));
  failures |= demoCheck("zeliNorm_L2_8u_C1R", zeliNorm_L2_8u_C1R(src, step, roi, &all.l2));
  failures |= demoCheck("zeliMean_StdDev_8u_C1R", zeliMean_StdDev_8u_C1R(src, step, roi, &all.mean, &all.dev));
  failures |= demoCheck("zeliMinMaxIndx_8u_C1R",
                        zeliMinMaxIndx_8u_C1R(src, step, roi, &all.lo, &all.hi, &all.loAt, &all.hiAt));
  failures |= demoCheck("zeliNorm_Inf_8u_C1MR",
                        zeliNorm_Inf_8u_C1MR(src, step, mask.pixels, mask.step, roi, &region.inf));
  failures |= demoCheck("zeliNorm_L1_8u_C1MR", zeliNorm_L1_8u_C1MR(src, step, mask.pixels, mask.step, roi, &region.l1));
  failures |= demoCheck("zeliNorm_L2_8u_C1MR", zeliNorm_L2_8u_C1MR(src, step, mask.pixels, mask.step, roi, &region.l2));
  failures |= demoCheck("zeliMean_StdDev_8u_C1MR", zeliMean_StdDev_8u_C1MR(src, step, mask.pixels, mask.step, roi,
                                                                           &region.mean, &region.dev));
  failures |= demoCheck("zeliMinMaxIndx_8u_C1MR",
                        zeliMinMaxIndx_8u_C1MR(src, step, mask.pixels, mask.step, roi, &region.lo, &region.hi,
                                               &region.loAt, &region.hiAt));
  if (failures) goto done;

  printf("  statistics (whole picture | largest region brighter than the mean %.2f):\n", mean);
  printf("    %-10s %16s   %16s\n", "", "picture", "region");
  printf("    %-10s %16.0f   %16.0f\n", "norm inf", all.inf, region.inf);
  printf("    %-10s %16.0f   %16.0f\n", "norm L1", all.l1, region.l1);
  printf("    %-10s %16.2f   %16.2f\n", "norm L2", all.l2, region.l2);
  printf("    %-10s %16.3f   %16.3f\n", "mean", all.mean, region.mean);
  printf("    %-10s %16.3f   %16.3f\n", "std dev", all.dev, region.dev);
  printf("    %-10s %5.0f at %3d,%3d   %5.0f at %3d,%3d\n", "minimum", all.lo, all.loAt.x, all.loAt.y, region.lo,
         region.loAt.x, region.loAt.y);
  printf("    %-10s %5.0f at %3d,%3d   %5.0f at %3d,%3d\n", "maximum", all.hi, all.hiAt.x, all.hiAt.y, region.hi,
         region.hiAt.x, region.hiAt.y);
  failures |= demoWritePgm(outDir, "statistics_region.pgm", mask.pixels, mask.step, w, h);

done:
  free(stack);
  free(bright);
  demoFreeImage(&mask);
  return failures;
}
