/* zelcv-demo: prints the version record and the processor features, then runs
 * each family on a generated test image and writes the results as PGM
 * pictures into the directory given as the first argument (default: .). */
#include <stdio.h>
#include <stdlib.h>

#include "demo.h"
#include "zelcore.h"

int main(int argc, char** argv) {
  const char* outDir = argc > 1 ? argv[1] : ".";
  const ZelLibraryVersion* v = zelcvGetLibVersion();
  uint32_t features = zelGetEnabledCpuFeatures();
  int cache = 0;
  int cacheStatus = zelGetMaxCacheSizeB(&cache);

  printf("%s %s, built %s (target %s; %d.%d.%d.%d)\n", v->name, v->version, v->buildDate,
         v->targetCpu, v->major, v->minor, v->majorBuild, v->build);
  printf("processor features 0x%08x, feature flag (0x10 and 0x20) %d\n", (unsigned)features,
         (features & 0x30u) == 0x30u);
  if (cacheStatus == zelCoreStatusOk)
    printf("largest data cache %d bytes\n", cache);
  else
    printf("largest data cache unknown (status %d)\n", cacheStatus);

  DemoImage image = demoMakeImage(320, 240);
  int failures = demoWritePgm(outDir, "input.pgm", image.pixels, image.step, image.width,
                              image.height);
  /* Family steps go here, one call each. */
  failures |= demoArith(&image, outDir);
  failures |= demoCanny(&image, outDir);
  failures |= demoIntegral(&image, outDir);
  failures |= demoFilter(&image, outDir);
  failures |= demoMorph(&image, outDir);
  failures |= demoMorphAdv(&image, outDir);
  failures |= demoGrayMorph(&image, outDir);
  failures |= demoFloodFill(&image, outDir);
  failures |= demoPyramid(&image, outDir);
  failures |= demoDistance(&image, outDir);
  failures |= demoFilters(&image, outDir);
  failures |= demoStatistics(&image, outDir);
  failures |= demoUndistort(&image, outDir);
  failures |= demoOptFlow(&image, outDir);
  failures |= demoSegmentation(&image, outDir);
  failures |= demoBackground(&image, outDir);
  failures |= demoFeatures(&image, outDir);
  demoFreeImage(&image);
  return failures ? EXIT_FAILURE : EXIT_SUCCESS;
}
