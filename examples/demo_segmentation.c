/* Segmentation: the picture is cut into four grey bands, its regions of
 * equal band are labelled, 8-connected, and written in colour, one colour per label, with the lines
 * where labels change in black; then a scratch drawn across the picture is
 * inpainted by fast marching, and the scratched and repaired pictures are
 * written. */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include "demo.h"

/* Writes an RGB picture as binary PPM; returns 0 on success. */
static int writePpm(const char* outDir, const char* name, const Zel8u* rgb, int width, int height) {
  char path[1024];
  snprintf(path, sizeof path, "%s/%s", outDir, name);
  FILE* f = fopen(path, "wb");
  if (!f) {
    fprintf(stderr, "cannot write %s\n", path);
    return 1;
  }
  fprintf(f, "P6\n%d %d\n255\n", width, height);
  const size_t n = (size_t)width * height * 3;
  const int failed = fwrite(rgb, 1, n, f) != n;
  return fclose(f) != 0 || failed;
}

int demoSegmentation(const DemoImage* image, const char* outDir) {
  const int w = image->width, h = image->height;
  const ZeliSize roi = {w, h};
  int bytes = 0, regions = 0, failures = 0;
  Zel8u* binary = (Zel8u*)malloc((size_t)w * h);
  Zel32s* labels = (Zel32s*)malloc(sizeof(Zel32s) * (size_t)w * h);
  Zel8u* rgb = (Zel8u*)malloc((size_t)w * h * 3);
  Zel8u* buffer = NULL;
  ZeliInpaintState* state = NULL;
  DemoImage scratched = demoAllocImage(w, h), repaired = demoAllocImage(w, h);
  if (demoCheck("zeliLabelMarkersGetBufferSize_8u32s_C1R", zeliLabelMarkersGetBufferSize_8u32s_C1R(roi, &bytes)))
    failures = 1;
  if (!failures) buffer = (Zel8u*)malloc((size_t)bytes);
  if (failures || !binary || !labels || !rgb || !buffer || !scratched.pixels || !repaired.pixels) {
    if (!failures) fprintf(stderr, "segmentation demo: out of memory\n");
    failures = 1;
    goto done;
  }
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) binary[y * w + x] = (Zel8u)(1 + image->pixels[y * image->step + x] / 64);
  failures = demoCheck("zeliLabelMarkers_8u32s_C1R",
                       zeliLabelMarkers_8u32s_C1R(binary, w, labels, w * (int)sizeof(Zel32s), roi, 1, 1 << 30,
                                                  zelNormInf, &regions, buffer));
  failures = failures || demoCheck("zeliBoundSegments_32s_C1IR",
                                   zeliBoundSegments_32s_C1IR(labels, w * (int)sizeof(Zel32s), roi, -1, zelNormInf));
  if (failures) goto done;
  for (int i = 0; i < w * h; ++i) {
    const unsigned l = (unsigned)labels[i];
    const unsigned hash = l * 2654435761u;
    const int line = labels[i] == -1;
    rgb[3 * i + 0] = (Zel8u)(line ? 0 : 64 + (hash >> 24) % 192);
    rgb[3 * i + 1] = (Zel8u)(line ? 0 : 64 + (hash >> 16) % 192);
    rgb[3 * i + 2] = (Zel8u)(line ? 0 : 64 + (hash >> 8) % 192);
  }
  printf("  segmentation: %d regions of four grey bands\n", regions);
  failures = writePpm(outDir, "segmentation_labels.ppm", rgb, w, h);

  /* A scratch three pixels wide along a diagonal and a bar across. */
  memset(binary, 0, (size_t)w * h);
  for (int y = 0; y < h; ++y) {
    memcpy(scratched.pixels + y * scratched.step, image->pixels + y * image->step, (size_t)w);
    for (int d = -1; d <= 1; ++d) {
      const int x = y * w / h + d;
      if (x >= 0 && x < w) binary[y * w + x] = 1;
    }
    if (y >= h / 3 && y < h / 3 + 4)
      for (int x = w / 5; x < 4 * w / 5; ++x) binary[y * w + x] = 1;
    for (int x = 0; x < w; ++x)
      if (binary[y * w + x]) scratched.pixels[y * scratched.step + x] = 255;
  }
  failures = failures || demoCheck("zeliInpaintInitAlloc_8u_C1R", zeliInpaintInitAlloc_8u_C1R(binary, w, roi, 5.0f, &state));
  failures = failures || demoCheck("zeliInpaint_8u_C1R", zeliInpaint_8u_C1R(scratched.pixels, scratched.step, repaired.pixels,
                                                                           repaired.step, roi, state));
  if (failures) goto done;
  failures = demoWritePgm(outDir, "inpaint_scratched.pgm", scratched.pixels, scratched.step, w, h) ||
             demoWritePgm(outDir, "inpaint_repaired.pgm", repaired.pixels, repaired.step, w, h);

done:
  if (state) zeliInpaintFree_8u_C1R(state);
  free(buffer);
  free(rgb);
  free(labels);
  free(binary);
  demoFreeImage(&scratched);
  demoFreeImage(&repaired);
  return failures;
}
