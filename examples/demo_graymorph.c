/* Grey-level morphology step: the holes of the demo picture's regions filled
 * by reconstruction by erosion (the marker is the picture on its frame and
 * white inside, the mask the picture itself), and a grey dilation with a
 * 7 x 7 paraboloid. */
#include <stdlib.h>
#include <string.h>

#include "demo.h"

static int fillHoles(const DemoImage* image, const char* outDir) {
  const ZeliSize roi = {image->width, image->height};
  int bufferSize = 0;
  int failures = demoCheck("zeliMorphReconstructGetBufferSize_8u_C1",
                           zeliMorphReconstructGetBufferSize_8u_C1(roi, &bufferSize));
  if (failures) return failures;
  Zel8u* buffer = (Zel8u*)malloc((size_t)bufferSize);
  DemoImage marker = demoAllocImage(image->width, image->height);
  if (!buffer || !marker.pixels) {
    failures = 1;
  } else {
    for (int y = 0; y < image->height; ++y) {
      const Zel8u* in = image->pixels + (size_t)y * (size_t)image->step;
      Zel8u* out = marker.pixels + (size_t)y * (size_t)marker.step;
      if (y == 0 || y == image->height - 1) {
        memcpy(out, in, (size_t)image->width);
      } else {
        memset(out, 255, (size_t)image->width);
        out[0] = in[0];
        out[image->width - 1] = in[image->width - 1];
      }
    }
    failures |= demoCheck("zeliMorphReconstructErode_8u_C1IR",
                          zeliMorphReconstructErode_8u_C1IR(marker.pixels, marker.step, image->pixels, image->step,
                                                            roi, zelNormL1, buffer));
    failures |= demoWritePgm(outDir, "graymorph_fill_holes.pgm", marker.pixels, marker.step, marker.width,
                             marker.height);
  }
  demoFreeImage(&marker);
  free(buffer);
  return failures;
}

static int grayDilate(const DemoImage* image, const char* outDir) {
  enum { kSize = 7 };
  Zel32s ball[kSize * kSize];
  for (int j = 0; j < kSize; ++j)
    for (int i = 0; i < kSize; ++i) ball[j * kSize + i] = -6 * ((i - 3) * (i - 3) + (j - 3) * (j - 3));
  const ZeliSize maskSize = {kSize, kSize};
  const ZeliSize roi = {image->width, image->height};
  const ZeliPoint anchor = {3, 3};
  ZeliMorphGrayState* state = NULL;
  int failures = demoCheck("zeliMorphGrayInitAlloc_8u_C1R",
                           zeliMorphGrayInitAlloc_8u_C1R(image->width, ball, maskSize, anchor, &state));
  if (failures) return failures;
  DemoImage out = demoAllocImage(image->width, image->height);
  if (!out.pixels) {
    failures = 1;
  } else {
    failures |= demoCheck("zeliGrayDilateBorder_8u_C1R",
                          zeliGrayDilateBorder_8u_C1R(image->pixels, image->step, out.pixels, out.step, roi,
                                                      zelBorderReplicate, state));
    failures |= demoWritePgm(outDir, "graymorph_dilate.pgm", out.pixels, out.step, out.width, out.height);
  }
  demoFreeImage(&out);
  failures |= demoCheck("zeliMorphGrayFree_8u_C1R", zeliMorphGrayFree_8u_C1R(state));
  return failures;
}

int demoGrayMorph(const DemoImage* image, const char* outDir) {
  return fillHoles(image, outDir) | grayDilate(image, outDir);
}
