/* zelcv: Flood fill.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_FLOODFILL_H
#define ZELCV_FLOODFILL_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Flood fill ------------------------------------------------------- */
/* The record a fill writes: the number of pixels filled, the fill value
 * (value[1] and value[2] are 0 for one-channel images) and the bounding
 * rectangle of the filled pixels in ROI coordinates (x leftmost column, y top
 * row, width and height inclusive of both ends). */
typedef struct {
  Zel64f area;
  Zel64f value[3];
  ZeliRect rect;
} ZeliConnectedComp;

/* Every fill repaints, in place, the region connected to `seed` (4- or
 * 8-connected, as the name says) and writes `region`. Criteria:
 *   plain (4Con, 8Con): a pixel joins when every channel equals the seed
 *     pixel's (floats compare with ==, so NaN never joins).
 *   Range: with s the seed pixel, lo = s - minDelta and hi = s + maxDelta
 *     per channel, clamped to the type's range for 8u and 16u and computed in
 *     single precision for 32f; a pixel joins when lo <= v <= hi in every
 *     channel (a NaN never does). A pixel equal to newVal in every channel
 *     counts as already filled, also when newVal lies inside [lo, hi].
 *   Grad: a pixel joins when, in every channel, p - minDelta <= q <= p +
 *     maxDelta, with q its value and p the value of an already accepted
 *     pixel through which it is reached (all tests see the values on entry).
 *     8u and 16u evaluate this as the unsigned 32-bit comparison
 *     q + minDelta - p <= minDelta + maxDelta; 32f in single precision as
 *     |q + (minDelta - maxDelta) * 0.5 - p| <= (minDelta + maxDelta) * 0.5.
 *     The region is every pixel reachable from the seed by such steps: with
 *     8-connectivity a pixel may be reached from any of its up to eight
 *     neighbours.
 *
 * Algorithm (shared by all): the seed's run along its row is filled, then a
 * stack of spans (y, left, right, parentLeft, parentRight, dir; six 32-bit
 * integers each, starting at the first 8-byte-aligned address of the buffer;
 * for Grad at the first 8-byte-aligned address after the mask) is processed
 * last in, first out: each popped span scans the row beyond it over its own
 * columns (one more on each side with 8-connectivity) and the parent row
 * where the parent did not cover it, and pushes each run it fills.
 *   Plain and Range paint as they go and recognise filled pixels by their
 *   value. If the seed pixel already equals newVal they return 0 at once,
 *   writing neither the image nor the record. A one-row image fills the seed
 *   run only.
 *   Grad keeps a visited mask of (w + 2) x (h + 2) bytes at the start of the
 *   buffer (a frame of 1s, the interior 0 on entry) and paints each span
 *   after both of its neighbour rows were scanned. It has no early exit.
 * Stack overflow (deliberate, keep it in mind for regions that are mostly
 * thin runs): the stack holds floor(w x h / 4) entries for Plain and Range
 * and floor((16 x w x h + 57) / 24) for Grad. A push that brings the count to
 * that number sets it to 0: later pushes overwrite the bottom of the stack
 * and the fill ends as soon as the stack is empty again. So Plain and Range
 * fill only the seed's run on images of 1 to 7 pixels; a region cut short
 * this way is still reported as what was filled (for Grad, spans marked but
 * never popped are neither painted nor counted).
 *
 * Checks, in this order: image, region, buffer (and for C3 newVal, minDelta,
 * maxDelta) null -8; w or h < 1 -6; imageStep < w x channels x element size
 * -14; 16u, 32s and 32f: imageStep not a multiple of the element size -108;
 * seed outside the ROI -11; 32f Grad: minDelta or maxDelta below 0 -11.
 * A failed call writes nothing. A buffer smaller than the size query's answer
 * is not detected. */

/* Buffer sizes: FloodFillGetSize for Plain and Range, 6 x w x h + 32 bytes
 * (evaluated as (24 x h x w) / 4 + 32); FloodFillGetSize_Grad for Grad,
 * 16 x w x h + (w + 2) x (h + 2) + 64 bytes. Both are evaluated in 64-bit
 * arithmetic. Checks: null bufferSize -8; w or h < 1 -6; a size above
 * INT_MAX -6 (nothing written). */
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFillGetSize(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFillGetSize_Grad(ZeliSize roiSize, int* bufferSize);

/* Plain criterion: a pixel joins when it equals the seed pixel. */
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_4Con_8u_C1IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                          ZeliPoint seed, Zel8u newVal,
                                                          ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_4Con_8u_C3IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                          ZeliPoint seed, const Zel8u* newVal,
                                                          ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_4Con_16u_C1IR(Zel16u* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, Zel16u newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_4Con_16u_C3IR(Zel16u* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, const Zel16u* newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_4Con_32s_C1IR(Zel32s* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, Zel32s newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_4Con_32f_C1IR(Zel32f* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, Zel32f newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_4Con_32f_C3IR(Zel32f* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, const Zel32f* newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_8Con_8u_C1IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                          ZeliPoint seed, Zel8u newVal,
                                                          ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_8Con_8u_C3IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                          ZeliPoint seed, const Zel8u* newVal,
                                                          ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_8Con_16u_C1IR(Zel16u* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, Zel16u newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_8Con_16u_C3IR(Zel16u* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, const Zel16u* newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_8Con_32s_C1IR(Zel32s* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, Zel32s newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_8Con_32f_C1IR(Zel32f* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, Zel32f newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_8Con_32f_C3IR(Zel32f* image, int imageStep, ZeliSize roiSize,
                                                           ZeliPoint seed, const Zel32f* newVal,
                                                           ZeliConnectedComp* region, Zel8u* buffer);
/* Range criterion: every channel within [seed - minDelta, seed + maxDelta]. */
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range4Con_8u_C1IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                               ZeliPoint seed, Zel8u newVal, Zel8u minDelta,
                                                               Zel8u maxDelta, ZeliConnectedComp* region,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range4Con_8u_C3IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                               ZeliPoint seed, const Zel8u* newVal,
                                                               const Zel8u* minDelta, const Zel8u* maxDelta,
                                                               ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range4Con_16u_C1IR(Zel16u* image, int imageStep,
                                                                ZeliSize roiSize, ZeliPoint seed,
                                                                Zel16u newVal, Zel16u minDelta,
                                                                Zel16u maxDelta, ZeliConnectedComp* region,
                                                                Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range4Con_16u_C3IR(Zel16u* image, int imageStep,
                                                                ZeliSize roiSize, ZeliPoint seed,
                                                                const Zel16u* newVal, const Zel16u* minDelta,
                                                                const Zel16u* maxDelta,
                                                                ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range4Con_32f_C1IR(Zel32f* image, int imageStep,
                                                                ZeliSize roiSize, ZeliPoint seed,
                                                                Zel32f newVal, Zel32f minDelta,
                                                                Zel32f maxDelta, ZeliConnectedComp* region,
                                                                Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range4Con_32f_C3IR(Zel32f* image, int imageStep,
                                                                ZeliSize roiSize, ZeliPoint seed,
                                                                const Zel32f* newVal, const Zel32f* minDelta,
                                                                const Zel32f* maxDelta,
                                                                ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range8Con_8u_C1IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                               ZeliPoint seed, Zel8u newVal, Zel8u minDelta,
                                                               Zel8u maxDelta, ZeliConnectedComp* region,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range8Con_8u_C3IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                               ZeliPoint seed, const Zel8u* newVal,
                                                               const Zel8u* minDelta, const Zel8u* maxDelta,
                                                               ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range8Con_16u_C1IR(Zel16u* image, int imageStep,
                                                                ZeliSize roiSize, ZeliPoint seed,
                                                                Zel16u newVal, Zel16u minDelta,
                                                                Zel16u maxDelta, ZeliConnectedComp* region,
                                                                Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range8Con_16u_C3IR(Zel16u* image, int imageStep,
                                                                ZeliSize roiSize, ZeliPoint seed,
                                                                const Zel16u* newVal, const Zel16u* minDelta,
                                                                const Zel16u* maxDelta,
                                                                ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range8Con_32f_C1IR(Zel32f* image, int imageStep,
                                                                ZeliSize roiSize, ZeliPoint seed,
                                                                Zel32f newVal, Zel32f minDelta,
                                                                Zel32f maxDelta, ZeliConnectedComp* region,
                                                                Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Range8Con_32f_C3IR(Zel32f* image, int imageStep,
                                                                ZeliSize roiSize, ZeliPoint seed,
                                                                const Zel32f* newVal, const Zel32f* minDelta,
                                                                const Zel32f* maxDelta,
                                                                ZeliConnectedComp* region, Zel8u* buffer);
/* Gradient criterion: every channel within [p - minDelta, p + maxDelta] of the
 * accepted neighbour p through which the pixel is reached. */
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad4Con_8u_C1IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                              ZeliPoint seed, Zel8u newVal, Zel8u minDelta,
                                                              Zel8u maxDelta, ZeliConnectedComp* region,
                                                              Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad4Con_8u_C3IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                              ZeliPoint seed, const Zel8u* newVal,
                                                              const Zel8u* minDelta, const Zel8u* maxDelta,
                                                              ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad4Con_16u_C1IR(Zel16u* image, int imageStep,
                                                               ZeliSize roiSize, ZeliPoint seed,
                                                               Zel16u newVal, Zel16u minDelta,
                                                               Zel16u maxDelta, ZeliConnectedComp* region,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad4Con_16u_C3IR(Zel16u* image, int imageStep,
                                                               ZeliSize roiSize, ZeliPoint seed,
                                                               const Zel16u* newVal, const Zel16u* minDelta,
                                                               const Zel16u* maxDelta,
                                                               ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad4Con_32f_C1IR(Zel32f* image, int imageStep,
                                                               ZeliSize roiSize, ZeliPoint seed,
                                                               Zel32f newVal, Zel32f minDelta,
                                                               Zel32f maxDelta, ZeliConnectedComp* region,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad4Con_32f_C3IR(Zel32f* image, int imageStep,
                                                               ZeliSize roiSize, ZeliPoint seed,
                                                               const Zel32f* newVal, const Zel32f* minDelta,
                                                               const Zel32f* maxDelta,
                                                               ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad8Con_8u_C1IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                              ZeliPoint seed, Zel8u newVal, Zel8u minDelta,
                                                              Zel8u maxDelta, ZeliConnectedComp* region,
                                                              Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad8Con_8u_C3IR(Zel8u* image, int imageStep, ZeliSize roiSize,
                                                              ZeliPoint seed, const Zel8u* newVal,
                                                              const Zel8u* minDelta, const Zel8u* maxDelta,
                                                              ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad8Con_16u_C1IR(Zel16u* image, int imageStep,
                                                               ZeliSize roiSize, ZeliPoint seed,
                                                               Zel16u newVal, Zel16u minDelta,
                                                               Zel16u maxDelta, ZeliConnectedComp* region,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad8Con_16u_C3IR(Zel16u* image, int imageStep,
                                                               ZeliSize roiSize, ZeliPoint seed,
                                                               const Zel16u* newVal, const Zel16u* minDelta,
                                                               const Zel16u* maxDelta,
                                                               ZeliConnectedComp* region, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad8Con_32f_C1IR(Zel32f* image, int imageStep,
                                                               ZeliSize roiSize, ZeliPoint seed,
                                                               Zel32f newVal, Zel32f minDelta,
                                                               Zel32f maxDelta, ZeliConnectedComp* region,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFloodFill_Grad8Con_32f_C3IR(Zel32f* image, int imageStep,
                                                               ZeliSize roiSize, ZeliPoint seed,
                                                               const Zel32f* newVal, const Zel32f* minDelta,
                                                               const Zel32f* maxDelta,
                                                               ZeliConnectedComp* region, Zel8u* buffer);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_FLOODFILL_H */
