/* Undistortion step: the demo picture is barrel-distorted through a map that
 * inverts the lens model (a few fixed-point steps per pixel) and resampled
 * with zeliRemapBilinear_8u_C1R; zeliUndistortRadial_8u_C1R then straightens
 * it again. Both pictures are written, with the mean difference from the
 * original inside the part that stays in view (two resamplings soften edges). */
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"

int demoUndistort(const DemoImage* image, const char* outDir) {
  const ZeliSize roi = {image->width, image->height};
  const int w = image->width, h = image->height;
  const float fx = 0.9f * (float)w, fy = 0.9f * (float)w, cx = 0.5f * (float)(w - 1), cy = 0.5f * (float)(h - 1);
  const float k1 = -0.3f, k2 = 0.08f;
  int bytes = 0, failures = 0;
  if (demoCheck("zeliUndistortGetSize", zeliUndistortGetSize(roi, &bytes))) return 1;
  DemoImage distorted = demoAllocImage(w, h), restored = demoAllocImage(w, h);
  Zel8u* buffer = (Zel8u*)malloc((size_t)bytes);
  Zel32f* xMap = (Zel32f*)malloc(sizeof(Zel32f) * (size_t)w * h);
  Zel32f* yMap = (Zel32f*)malloc(sizeof(Zel32f) * (size_t)w * h);
  if (!distorted.pixels || !restored.pixels || !buffer || !xMap || !yMap) {
    fprintf(stderr, "undistort demo: out of memory\n");
    failures = 1;
    goto done;
  }
  /* Distorted pixel (u, v) shows the ideal point whose distortion lands on
   * it: solve xd = x (1 + k1 r2 + k2 r2^2) for x by fixed-point steps. */
  for (int v = 0; v < h; ++v)
    for (int u = 0; u < w; ++u) {
      const float xd = ((float)u - cx) / fx, yd = ((float)v - cy) / fy;
      float x = xd, y = yd;
      for (int step = 0; step < 20; ++step) {
        const float r2 = x * x + y * y;
        const float kr = 1.0f + r2 * (k1 + r2 * k2);
        x = xd / kr;
        y = yd / kr;
      }
      xMap[v * w + u] = x * fx + cx;
      yMap[v * w + u] = y * fy + cy;
    }
  failures = demoCheck("zeliRemapBilinear_8u_C1R",
                       zeliRemapBilinear_8u_C1R(image->pixels, image->step, roi, xMap, w * (int)sizeof(Zel32f), yMap,
                                                w * (int)sizeof(Zel32f), distorted.pixels, distorted.step, roi));
  if (failures) goto done;
  failures = demoCheck("zeliUndistortRadial_8u_C1R",
                       zeliUndistortRadial_8u_C1R(distorted.pixels, distorted.step, restored.pixels, restored.step,
                                                  roi, fx, fy, cx, cy, k1, k2, 0.0f, 0.0f, buffer));
  if (failures) goto done;
  {
    /* The middle half of the picture stays in view through both steps. */
    long total = 0, count = 0;
    for (int y = h / 4; y < 3 * h / 4; ++y)
      for (int x = w / 4; x < 3 * w / 4; ++x, ++count) {
        const int d = (int)restored.pixels[y * restored.step + x] - (int)image->pixels[y * image->step + x];
        total += d < 0 ? -d : d;
      }
    printf("  undistort: restored centre differs from the original by %.2f grey levels on average\n",
           count ? (double)total / (double)count : 0.0);
  }
  failures = demoWritePgm(outDir, "undistort_barrel.pgm", distorted.pixels, distorted.step, w, h) ||
             demoWritePgm(outDir, "undistort_restored.pgm", restored.pixels, restored.step, w, h);
done:
  free(buffer);
  free(xMap);
  free(yMap);
  demoFreeImage(&distorted);
  demoFreeImage(&restored);
  return failures;
}
