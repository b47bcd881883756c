/* Gaussian-mixture background: a short synthetic sequence (the demo picture
 * in colour, mild noise, a bright square crossing it); the mask of the last
 * frame and the learnt background are written as pictures. */
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"

int demoBackground(const DemoImage* image, const char* outDir) {
  const int w = image->width, h = image->height, frames = 40, side = h / 4;
  const ZeliSize roi = {w, h};
  int bytes = 0, failures = 0;
  unsigned seed = 12345u;
  failures |= demoCheck("zeliFGMMGetBufferSize_8u_C3R", zeliFGMMGetBufferSize_8u_C3R(roi, 3, &bytes));
  if (failures) return failures;
  Zel8u* block = (Zel8u*)malloc((size_t)bytes);
  Zel8u* frame = (Zel8u*)malloc((size_t)w * h * 3);
  DemoImage mask = demoAllocImage(w, h);
  DemoImage grey = demoAllocImage(w, h);
  if (!block || !frame || !mask.pixels || !grey.pixels) {
    fprintf(stderr, "background demo: out of memory\n");
    failures = 1;
    goto done;
  }
  ZeliFGMMState* model = (ZeliFGMMState*)block;
  failures |= demoCheck("zeliFGMMInit_8u_C3R", zeliFGMMInit_8u_C3R(roi, 3, NULL, model));
  for (int t = 0; t < frames && !failures; ++t) {
    const int left = t * (w - side) / (frames - 1), top = h / 2 - side / 2;
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w; ++x) {
        const int inside = x >= left && x < left + side && y >= top && y < top + side;
        for (int c = 0; c < 3; ++c) {
          seed = seed * 1103515245u + 12345u;
          int v = image->pixels[y * image->step + x] + c * 20 + (int)((seed >> 16) % 7) - 3;
          if (inside) v = c == 1 ? 230 : 40;
          frame[((size_t)y * w + x) * 3 + c] = (Zel8u)(v < 0 ? 0 : v > 255 ? 255 : v);
        }
      }
    failures |= demoCheck("zeliFGMMForeground_8u_C3R",
                          zeliFGMMForeground_8u_C3R(frame, w * 3, mask.pixels, mask.step, roi, model));
  }
  if (failures) goto done;
  failures |= demoWritePgm(outDir, "background_mask.pgm", mask.pixels, mask.step, w, h);
  failures |= demoCheck("zeliFGMMBackground_8u_C3R", zeliFGMMBackground_8u_C3R(frame, w * 3, roi, model));
  if (failures) goto done;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) grey.pixels[y * grey.step + x] = frame[((size_t)y * w + x) * 3];
  failures |= demoWritePgm(outDir, "background_model.pgm", grey.pixels, grey.step, w, h);
done:
  demoFreeImage(&grey);
  demoFreeImage(&mask);
  free(frame);
  free(block);
  return failures;
}
