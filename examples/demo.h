/* Shared pieces of zelcv-demo: the generated test image and picture output.
 * Each family adds one step (demo_<family>.c) and one line in zelcv_demo.c. */
#ifndef ZELCV_DEMO_H
#define ZELCV_DEMO_H

#include "zelcv.h"

typedef struct {
  int width, height, step; /* step in bytes */
  Zel8u* pixels;
} DemoImage;

/* A grey test picture: smooth shapes (discs, a ramp, a bar) plus mild noise. */
DemoImage demoMakeImage(int width, int height);
DemoImage demoAllocImage(int width, int height);
void demoFreeImage(DemoImage* image);

/* Writes an 8-bit picture as binary PGM to outDir/name; returns 0 on success. */
int demoWritePgm(const char* outDir, const char* name, const Zel8u* pixels, int step, int width,
                 int height);

/* Reports a failed call and returns 1, or returns 0 for zelStatusOk. */
int demoCheck(const char* what, ZelStatus status);

/* Family steps. */
int demoCanny(const DemoImage* image, const char* outDir);
int demoIntegral(const DemoImage* image, const char* outDir);
int demoArith(const DemoImage* image, const char* outDir);
int demoFilter(const DemoImage* image, const char* outDir);
int demoMorph(const DemoImage* image, const char* outDir);
int demoMorphAdv(const DemoImage* image, const char* outDir);
int demoFloodFill(const DemoImage* image, const char* outDir);
int demoPyramid(const DemoImage* image, const char* outDir);
int demoDistance(const DemoImage* image, const char* outDir);
int demoFilters(const DemoImage* image, const char* outDir);
int demoStatistics(const DemoImage* image, const char* outDir);
int demoUndistort(const DemoImage* image, const char* outDir);
int demoOptFlow(const DemoImage* image, const char* outDir);
int demoSegmentation(const DemoImage* image, const char* outDir);
int demoBackground(const DemoImage* image, const char* outDir);
int demoGrayMorph(const DemoImage* image, const char* outDir);
int demoFeatures(const DemoImage* image, const char* outDir);

#endif
