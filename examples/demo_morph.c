/* Flat morphology step: dilation and erosion of the demo picture with a
 * 7 x 7 disc, replicated border, through the caller-memory state. */
#include <stdlib.h>

#include "demo.h"

int demoMorph(const DemoImage* image, const char* outDir) {
  enum { kSize = 7 };
  Zel8u disc[kSize * kSize];
  for (int j = 0; j < kSize; ++j)
    for (int i = 0; i < kSize; ++i) {
      int dx = 2 * i - (kSize - 1), dy = 2 * j - (kSize - 1);
      disc[j * kSize + i] = dx * dx + dy * dy <= kSize * kSize;
    }
  const ZeliSize maskSize = {kSize, kSize};
  const ZeliSize roi = {image->width, image->height};
  int stateSize = 0, bufferSize = 0;
  int failures = demoCheck("zeliMorphologyBorderGetSize_8u_C1R",
                           zeliMorphologyBorderGetSize_8u_C1R(image->width, maskSize, &stateSize, &bufferSize));
  if (failures) return failures;
  ZeliMorphState* state = (ZeliMorphState*)malloc((size_t)stateSize);
  Zel8u* buffer = (Zel8u*)malloc((size_t)bufferSize);
  DemoImage out = demoAllocImage(image->width, image->height);
  if (!state || !buffer || !out.pixels) {
    failures = 1;
  } else {
    failures |= demoCheck("zeliMorphologyBorderInit_8u_C1R",
                          zeliMorphologyBorderInit_8u_C1R(image->width, disc, maskSize, state, buffer));
    if (!failures) {
      failures |= demoCheck("zeliDilateBorder_8u_C1R",
                            zeliDilateBorder_8u_C1R(image->pixels, image->step, out.pixels, out.step, roi,
                                                    zelBorderReplicate, 0, state, buffer));
      failures |= demoWritePgm(outDir, "morph_dilate.pgm", out.pixels, out.step, out.width, out.height);
      failures |= demoCheck("zeliErodeBorder_8u_C1R",
                            zeliErodeBorder_8u_C1R(image->pixels, image->step, out.pixels, out.step, roi,
                                                   zelBorderReplicate, 0, state, buffer));
      failures |= demoWritePgm(outDir, "morph_erode.pgm", out.pixels, out.step, out.width, out.height);
    }
  }
  demoFreeImage(&out);
  free(buffer);
  free(state);
  return failures;
}
