#include <math.h>
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"

DemoImage demoAllocImage(int width, int height) {
  DemoImage image = {width, height, (width + 15) & ~15, NULL};
  image.pixels = (Zel8u*)calloc((size_t)image.step * (size_t)height, 1);
  return image;
}

void demoFreeImage(DemoImage* image) {
  free(image->pixels);
  image->pixels = NULL;
}

DemoImage demoMakeImage(int width, int height) {
  DemoImage image = demoAllocImage(width, height);
  unsigned seed = 12345u;
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      double v = 60.0 + 60.0 * x / width; /* ramp */
      double dx = x - 0.35 * width, dy = y - 0.45 * height;
      if (dx * dx + dy * dy < 0.04 * width * width) v = 200.0;
      dx = x - 0.72 * width;
      dy = y - 0.6 * height;
      if (dx * dx + 2.0 * dy * dy < 0.02 * width * width) v = 25.0;
      if (y > 0.8 * height && y < 0.88 * height && x > 0.1 * width && x < 0.9 * width) v = 240.0;
      seed = seed * 1103515245u + 12345u;
      v += (double)((seed >> 16) % 13) - 6.0;
      image.pixels[y * image.step + x] = (Zel8u)(v < 0 ? 0 : v > 255 ? 255 : v);
    }
  }
  return image;
}

int demoWritePgm(const char* outDir, const char* name, const Zel8u* pixels, int step, int width,
                 int height) {
  char path[1024];
  snprintf(path, sizeof path, "%s/%s", outDir, name);
  FILE* f = fopen(path, "wb");
  if (!f) {
    fprintf(stderr, "cannot write %s\n", path);
    return 1;
  }
  fprintf(f, "P5\n%d %d\n255\n", width, height);
  for (int y = 0; y < height; ++y) fwrite(pixels + (size_t)y * step, 1, (size_t)width, f);
  fclose(f);
  printf("  wrote %s\n", path);
  return 0;
}

int demoCheck(const char* what, ZelStatus status) {
  if (status == zelStatusOk) return 0;
  fprintf(stderr, "%s failed with status %d\n", what, (int)status);
  return 1;
}
