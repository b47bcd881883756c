/* zelcv: The Canny edge detector.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_CANNY_H
#define ZELCV_CANNY_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Canny edge detector ----------------------------------------------- */
/* Edge map: 255 on edge pixels, 0 elsewhere. The magnitude is thinned along
 * the quantised gradient direction (a plateau across an edge keeps its
 * first pixel, leftmost or topmost); candidates above the low threshold join
 * the edges 8-connected to a pixel strictly above the high threshold.
 * Thresholds: 0 <= low <= high, else zelStatusBadArgument (also for NaN).
 * A size whose work buffer would exceed INT_MAX bytes gives zelStatusBadSize
 * from the queries and the operations alike. */
/* The selectors zelFilterSobel/zelFilterScharr, zelMaskSize3x3/5x5 and
 * zelNormL1/L2 are in zelcv/base.h. */

/* Work buffer bytes for zeliCanny_16s8u_C1R and zeliCanny_32f8u_C1R. */
ZELCV_API ZelStatus ZELCV_CALL zeliCannyGetSize(ZeliSize roiSize, int* bufferSize);
/* Work buffer bytes for zeliCannyBorder_8u_C1R; filterType and norm are not
 * examined. */
ZELCV_API ZelStatus ZELCV_CALL zeliCannyBorderGetSize(ZeliSize roiSize, int filterType, int mask, int norm,
                                                      int* bufferSize);
/* From precomputed derivatives; magnitude |dx| + |dy|, kept when >= low. */
ZELCV_API ZelStatus ZELCV_CALL zeliCanny_16s8u_C1R(const Zel16s* srcDx, int srcDxStep, const Zel16s* srcDy,
                                                   int srcDyStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                                   Zel32f lowThreshold, Zel32f highThreshold, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliCanny_32f8u_C1R(const Zel32f* srcDx, int srcDxStep, const Zel32f* srcDy,
                                                   int srcDyStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                                   Zel32f lowThreshold, Zel32f highThreshold, Zel8u* buffer);
/* From an 8-bit image: 3x3 Sobel or Scharr, or 5x5 Sobel derivatives with
 * borders zelBorderConstant (borderValue), zelBorderReplicate or
 * zelBorderInMemory / the in-memory side flags (a pixel outside both a row
 * and a column end follows the vertical rule, then the horizontal one); the
 * norm is zelNormL1 or zelNormL2 (double precision); a magnitude is kept only
 * when > low. Checks: mask size (-33) before the pointers (-8), then size
 * (-6), steps (-14), filter/norm/thresholds (-5), border kind (-225). */
ZELCV_API ZelStatus ZELCV_CALL zeliCannyBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                      ZeliSize roiSize, int filterType, int mask,
                                                      ZeliBorderType borderType, Zel8u borderValue,
                                                      Zel32f lowThreshold, Zel32f highThreshold, int norm,
                                                      Zel8u* buffer);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_CANNY_H */
