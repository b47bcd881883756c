/* Integral images: a 9 x 9 box filter from four look-ups per pixel, and the
 * standard deviation over 7 x 7 windows (local contrast) scaled to 8 bits. */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include "demo.h"

int demoIntegral(const DemoImage* image, const char* outDir) {
  const int w = image->width, h = image->height, box = 9, win = 7;
  const int cols = w + 1, rows = h + 1;
  Zel32s* sum = (Zel32s*)malloc(sizeof(Zel32s) * (size_t)cols * rows);
  Zel64f* sqr = (Zel64f*)malloc(sizeof(Zel64f) * (size_t)cols * rows);
  Zel32f* dev = (Zel32f*)malloc(sizeof(Zel32f) * (size_t)w * h);
  DemoImage out = demoAllocImage(w, h);
  int failures = 0;
  if (!sum || !sqr || !dev || !out.pixels) {
    fprintf(stderr, "integral demo: out of memory\n");
    failures = 1;
    goto done;
  }
  failures |= demoCheck("zeliSqrIntegral_8u32s64f_C1R",
                        zeliSqrIntegral_8u32s64f_C1R(image->pixels, image->step, sum,
                                                     cols * (int)sizeof(Zel32s), sqr,
                                                     cols * (int)sizeof(Zel64f), (ZeliSize){w, h}, 0, 0.0));
  if (failures) goto done;

  /* Box mean: the window clipped at the picture's edges. */
  for (int y = 0; y < h; ++y) {
    int y0 = y - box / 2 < 0 ? 0 : y - box / 2, y1 = y + box / 2 + 1 > h ? h : y + box / 2 + 1;
    for (int x = 0; x < w; ++x) {
      int x0 = x - box / 2 < 0 ? 0 : x - box / 2, x1 = x + box / 2 + 1 > w ? w : x + box / 2 + 1;
      Zel32s s = sum[y1 * cols + x1] - sum[y0 * cols + x1] - sum[y1 * cols + x0] + sum[y0 * cols + x0];
      out.pixels[y * out.step + x] = (Zel8u)((s + (x1 - x0) * (y1 - y0) / 2) / ((x1 - x0) * (y1 - y0)));
    }
  }
  failures |= demoWritePgm(outDir, "integral_box.pgm", out.pixels, out.step, w, h);

  /* Deviation over the windows that fit; the border keeps 0. */
  {
    const int dw = w - win + 1, dh = h - win + 1;
    ZeliRect rect = {0, 0, win, win};
    float peak = 0.0f;
    failures |= demoCheck("zeliRectStdDev_32s32f_C1R",
                          zeliRectStdDev_32s32f_C1R(sum, cols * (int)sizeof(Zel32s), sqr,
                                                    cols * (int)sizeof(Zel64f), dev,
                                                    w * (int)sizeof(Zel32f), (ZeliSize){dw, dh}, rect));
    if (failures) goto done;
    for (int y = 0; y < dh; ++y)
      for (int x = 0; x < dw; ++x)
        if (dev[y * w + x] > peak) peak = dev[y * w + x];
    memset(out.pixels, 0, (size_t)out.step * h);
    for (int y = 0; y < dh; ++y)
      for (int x = 0; x < dw; ++x) {
        float v = peak > 0 ? 255.0f * dev[y * w + x] / peak : 0.0f;
        out.pixels[(y + win / 2) * out.step + x + win / 2] = (Zel8u)(v + 0.5f);
      }
    printf("  integral: 7x7 deviation peaks at %.2f\n", peak);
    failures |= demoWritePgm(outDir, "integral_stddev.pgm", out.pixels, out.step, w, h);
  }

done:
  demoFreeImage(&out);
  free(dev);
  free(sqr);
  free(sum);
  return failures;
}
