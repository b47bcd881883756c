/* Compound morphology step: top-hat (bright details smaller than the element)
 * and morphological gradient (edges) of the demo picture with a 9 x 9
 * square, replicated border. */
#include <stdlib.h>

#include "demo.h"

int demoMorphAdv(const DemoImage* image, const char* outDir) {
  enum { kSize = 9 };
  Zel8u square[kSize * kSize];
  for (int i = 0; i < kSize * kSize; ++i) square[i] = 1;
  const ZeliSize maskSize = {kSize, kSize};
  const ZeliSize roi = {image->width, image->height};
  int stateSize = 0, bufferSize = 0;
  int failures = demoCheck("zeliMorphAdvGetSize_8u_C1R",
                           zeliMorphAdvGetSize_8u_C1R(roi, maskSize, &stateSize, &bufferSize));
  if (failures) return failures;
  ZeliMorphAdvState* state = (ZeliMorphAdvState*)malloc((size_t)stateSize);
  Zel8u* buffer = (Zel8u*)malloc((size_t)bufferSize);
  DemoImage out = demoAllocImage(image->width, image->height);
  if (!state || !buffer || !out.pixels) {
    failures = 1;
  } else {
    failures |= demoCheck("zeliMorphAdvInit_8u_C1R", zeliMorphAdvInit_8u_C1R(roi, square, maskSize, state, buffer));
    if (!failures) {
      failures |= demoCheck("zeliMorphTophatBorder_8u_C1R",
                            zeliMorphTophatBorder_8u_C1R(image->pixels, image->step, out.pixels, out.step, roi,
                                                         zelBorderReplicate, 0, state, buffer));
      failures |= demoWritePgm(outDir, "morphadv_tophat.pgm", out.pixels, out.step, out.width, out.height);
      failures |= demoCheck("zeliMorphGradientBorder_8u_C1R",
                            zeliMorphGradientBorder_8u_C1R(image->pixels, image->step, out.pixels, out.step, roi,
                                                           zelBorderReplicate, 0, state, buffer));
      failures |= demoWritePgm(outDir, "morphadv_gradient.pgm", out.pixels, out.step, out.width, out.height);
    }
  }
  demoFreeImage(&out);
  free(buffer);
  free(state);
  return failures;
}
