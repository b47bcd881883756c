/* Accumulation and differences: an exponential running average of the
 * picture moving right one pixel per frame (a motion trail), and the
 * absolute difference between the picture and a copy shifted by 4 pixels. */
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"

enum { kFrames = 12, kShift = 4 };

/* Rounds and saturates a 32f image into an 8u one. */
static void toBytes(const Zel32f* src, int srcStep, Zel8u* dst, int dstStep, int width, int height) {
  for (int y = 0; y < height; ++y) {
    const Zel32f* s = (const Zel32f*)((const char*)src + (size_t)y * srcStep);
    Zel8u* d = dst + (size_t)y * dstStep;
    for (int x = 0; x < width; ++x) {
      float v = s[x] + 0.5f;
      d[x] = (Zel8u)(v < 0.0f ? 0 : v > 255.0f ? 255 : (int)v);
    }
  }
}

int demoArith(const DemoImage* image, const char* outDir) {
  const int w = image->width, h = image->height;
  const int accStep = w * (int)sizeof(Zel32f);
  Zel32f* acc = (Zel32f*)calloc((size_t)w * h, sizeof(Zel32f));
  DemoImage out = demoAllocImage(w, h);
  int failures = 0;
  if (!acc || !out.pixels) {
    free(acc);
    demoFreeImage(&out);
    return demoCheck("arith: allocation", zelStatusOutOfMemory);
  }

  /* Frame 0 starts the average; frame f is the picture moved right by f
   * pixels, so it covers columns f .. w-1 and reads columns 0 .. w-1-f. */
  ZeliSize roi = {w, h};
  failures |= demoCheck("Add_8u32f_C1IR", zeliAdd_8u32f_C1IR(image->pixels, image->step, acc, accStep, roi));
  for (int f = 1; f < kFrames && !failures; ++f) {
    ZeliSize moved = {w - f, h};
    failures |= demoCheck("AddWeighted_8u32f_C1IR",
                          zeliAddWeighted_8u32f_C1IR(image->pixels, image->step, acc + f, accStep, moved, 0.3f));
  }
  if (!failures) {
    toBytes(acc, accStep, out.pixels, out.step, w, h);
    failures |= demoWritePgm(outDir, "arith_running_average.pgm", out.pixels, out.step, w, h);
  }

  /* |picture - picture moved right by kShift|: bright where it has edges. */
  ZeliSize overlap = {w - kShift, h};
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < kShift; ++x) out.pixels[(size_t)y * out.step + x] = 0;
  failures |= demoCheck("AbsDiff_8u_C1R", zeliAbsDiff_8u_C1R(image->pixels + kShift, image->step, image->pixels,
                                                             image->step, out.pixels + kShift, out.step, overlap));
  if (!failures) failures |= demoWritePgm(outDir, "arith_absdiff.pgm", out.pixels, out.step, w, h);

  if (!failures) printf("arith: running average of %d moving frames, difference to a %d-pixel shift\n", kFrames,
                        kShift);
  free(acc);
  demoFreeImage(&out);
  return failures;
}
