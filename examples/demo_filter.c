/* Separable filter pipeline: a 5-tap binomial smoothing (1 4 6 4 1) of the
 * test picture, the row pass streaming into a ring of five rows and the
 * column pass writing each output row from five row pointers (the first and
 * last rows repeated at the vertical borders). */
#include <stdlib.h>

#include "demo.h"

enum { kTaps = 5, kAnchor = 2 };

int demoFilter(const DemoImage* image, const char* outDir) {
  static const Zel16s kernel[kTaps] = {1, 4, 6, 4, 1};
  const ZeliSize row = {image->width, 1};
  int rowBytes = 0, columnBytes = 0, failures = 0;
  failures |= demoCheck("FilterRowBorderPipelineGetBufferSize_8u16s_C1R",
                        zeliFilterRowBorderPipelineGetBufferSize_8u16s_C1R(row, kTaps, &rowBytes));
  failures |= demoCheck("FilterColumnPipelineGetBufferSize_16s8u_C1R",
                        zeliFilterColumnPipelineGetBufferSize_16s8u_C1R(row, kTaps, &columnBytes));
  if (failures) return 1;

  DemoImage out = demoAllocImage(image->width, image->height);
  Zel8u* rowBuffer = (Zel8u*)malloc((size_t)rowBytes);
  Zel8u* columnBuffer = (Zel8u*)malloc((size_t)columnBytes);
  Zel16s* ring = (Zel16s*)malloc(sizeof(Zel16s) * kTaps * (size_t)image->width);
  if (!out.pixels || !rowBuffer || !columnBuffer || !ring) {
    failures = 1;
  } else {
    int filtered = 0; /* source rows already in the ring */
    for (int y = 0; y < image->height && !failures; ++y) {
      const int last = y - kAnchor + kTaps - 1 < image->height ? y - kAnchor + kTaps - 1 : image->height - 1;
      for (; filtered <= last && !failures; ++filtered) {
        Zel16s* dst = ring + (size_t)(filtered % kTaps) * image->width;
        failures |= demoCheck("FilterRowBorderPipeline_8u16s_C1R",
                              zeliFilterRowBorderPipeline_8u16s_C1R(
                                  image->pixels + (size_t)filtered * image->step, image->step, &dst, row, kernel,
                                  kTaps, kAnchor, zelBorderReplicate, 0, 1, rowBuffer));
      }
      const Zel16s* rows[kTaps];
      for (int k = 0; k < kTaps; ++k) {
        int source = y - kAnchor + k;
        source = source < 0 ? 0 : source >= image->height ? image->height - 1 : source;
        rows[k] = ring + (size_t)(source % kTaps) * image->width;
      }
      if (!failures)
        failures |= demoCheck("FilterColumnPipeline_16s8u_C1R",
                              zeliFilterColumnPipeline_16s8u_C1R(rows, out.pixels + (size_t)y * out.step, out.step,
                                                                 row, kernel, kTaps, 256, columnBuffer));
    }
    if (!failures) failures |= demoWritePgm(outDir, "filter_binomial5.pgm", out.pixels, out.step, out.width, out.height);
  }
  free(ring);
  free(columnBuffer);
  free(rowBuffer);
  demoFreeImage(&out);
  return failures;
}
