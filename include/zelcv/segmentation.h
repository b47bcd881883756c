/* zelcv: Labelling, speckles, watershed, gradient segmentation, boundaries
 * and inpainting.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_SEGMENTATION_H
#define ZELCV_SEGMENTATION_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* Neighbourhoods. Every function here that takes `norm` reads it as the
 * distance that makes two pixels neighbours: zelNormInf (1) the 8 pixels at
 * chessboard distance 1, zelNormL1 (2) the 4 pixels at city-block distance 1.
 * Speckle marking is the exception: see there. */

/* ---- Marker labelling ------------------------------------------------- */
/* A marker image's connected regions of equal non-zero value become labels.
 * Pixels of value 0 are background: they stay 0 and separate regions. Two
 * neighbouring pixels (norm zelNormInf: 8-connected, zelNormL1:
 * 4-connected) belong to the same region when their values are equal.
 * Numbering: regions are numbered in the raster order of their first pixel
 * (top row first, each row left to right): the k-th region (k from 0) gets
 * minLabel + k while that is at most maxLabel, and every later region gets
 * maxLabel. *markersNum receives the number of regions found, which may
 * exceed maxLabel - minLabel + 1 (then the regions from that number on share
 * maxLabel). 8u32s writes every pixel of the 32s result (0 for background);
 * the in-place forms overwrite the region pixels only.
 * Labels: 1 <= minLabel <= maxLabel <= 254 (8u), 65534 (16u) or
 * 2147483646 (8u32s).
 * Buffer: 12 w h + 4 (h + 1) + 64 bytes for all three (evaluated in 64
 * bits); the query gives -8 for a null output, -6 for w or h below 1 or a
 * size above INT_MAX.
 * Checks, in order: null image(s), markersNum or buffer -8; w or h < 1 -6;
 * a step below the row bytes -14; a 16u or 32s step not a multiple of the
 * element size -108; a ROI whose buffer the query refuses -6; norm not
 * zelNormInf or zelNormL1 -5; minLabel < 1 or maxLabel above the type's limit
 * -5; maxLabel < minLabel -7. A failed call writes nothing. */
ZELCV_API ZelStatus ZELCV_CALL zeliLabelMarkersGetBufferSize_8u_C1R(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliLabelMarkersGetBufferSize_8u32s_C1R(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliLabelMarkersGetBufferSize_16u_C1R(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliLabelMarkers_8u_C1IR(Zel8u* markers, int markersStep, ZeliSize roiSize,
                                                        int minLabel, int maxLabel, int norm, int* markersNum,
                                                        Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliLabelMarkers_8u32s_C1R(const Zel8u* src, int srcStep, Zel32s* markers,
                                                          int markersStep, ZeliSize roiSize, int minLabel,
                                                          int maxLabel, int norm, int* markersNum,
                                                          Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliLabelMarkers_16u_C1IR(Zel16u* markers, int markersStep, ZeliSize roiSize,
                                                         int minLabel, int maxLabel, int norm, int* markersNum,
                                                         Zel8u* buffer);

/* ---- Speckle marking -------------------------------------------------- */
/* A speckle is a small region of similar values: pixels equal to
 * speckleVal take part in no region; two 4-neighbours (left, right, up,
 * down) that both differ from speckleVal are joined when |a - b| <=
 * maxPixDiff (integers: exact, in 32 bits; 32f: single-precision difference,
 * so a NaN never joins). Every region of at most maxSpeckleSize pixels is
 * set to speckleVal; all other pixels keep their values. Regions are
 * measured on the values on entry. maxSpeckleSize 0 changes nothing.
 * `norm` is the difference measure, and only zelNormInf (1), |a - b|, is
 * supported.
 * Buffer: 12 w h + 4 (h + 1) + 64 bytes whatever the type; dataType zel8u,
 * zel16u, zel16s or zel32f; the query gives -8 for a null output, -6 for w
 * or h below 1 or a size above INT_MAX, -12 for another type code.
 * Checks, in order: null image or buffer -8; w or h < 1 -6; step below the
 * row bytes -14; 16-bit steps not a multiple of 2, 32f steps not a multiple
 * of 4 -108; a ROI whose buffer the query refuses -6; norm other than 1
 * -229; maxSpeckleSize < 0, or maxPixDiff < 0 (16s, 32f; NaN too) -5. */
ZELCV_API ZelStatus ZELCV_CALL zeliMarkSpecklesGetBufferSize(ZeliSize roiSize, ZelDataType dataType,
                                                             int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMarkSpeckles_8u_C1IR(Zel8u* srcDst, int srcDstStep, ZeliSize roiSize,
                                                        Zel8u speckleVal, int maxSpeckleSize, Zel8u maxPixDiff,
                                                        int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMarkSpeckles_16u_C1IR(Zel16u* srcDst, int srcDstStep, ZeliSize roiSize,
                                                         Zel16u speckleVal, int maxSpeckleSize,
                                                         Zel16u maxPixDiff, int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMarkSpeckles_16s_C1IR(Zel16s* srcDst, int srcDstStep, ZeliSize roiSize,
                                                         Zel16s speckleVal, int maxSpeckleSize,
                                                         Zel16s maxPixDiff, int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMarkSpeckles_32f_C1IR(Zel32f* srcDst, int srcDstStep, ZeliSize roiSize,
                                                         Zel32f speckleVal, int maxSpeckleSize,
                                                         Zel32f maxPixDiff, int norm, Zel8u* buffer);

/* ---- Watershed and gradient segmentation ------------------------------ */
/* Both grow the seeds of a marker image over the ROI, in place. Marker
 * values: 0 unlabelled (to be flooded), the boundary value B (255 for 8u
 * markers, 65535 for 16u) a barrier that is never flooded and never floods,
 * anything else a seed label.
 * Flooding: a queue with 256 priority levels, first in first out within a
 * level, and a current level that never goes down: a pixel is queued at
 * max(current level, its priority), at most once per call.
 *   Start: every unlabelled pixel with a labelled neighbour, in raster order.
 *   Then, until the queue is empty, the oldest pixel of the lowest level is
 *   taken out; its labelled neighbours are looked at in the order left, up,
 *   right, down, up-left, up-right, down-left, down-right (the last four with
 *   zelNormInf only):
 *     with flag zelSegmentLines (1), a pixel that sees two different labels
 *     becomes B and queues nothing;
 *     otherwise it takes the label of the first labelled neighbour in that
 *     order, and queues each unlabelled neighbour not yet queued.
 *   With flag zelSegmentNoLines (0) every pixel reachable from a seed gets a
 *   label; pixels no seed reaches (cut off by barriers) stay 0.
 * Priorities: the watershed uses the relief value src of the queued pixel
 * (the seeds flood the relief from its lowest levels up); gradient
 * segmentation the largest channel difference max_c |I(q) - I(p)| between
 * the queued pixel q and the pixel p that queues it (at the start, the
 * smallest such difference over q's labelled neighbours), so regions grow
 * first along the smallest colour steps.
 * Buffer: 5 w h + 2112 bytes (the same for every form; evaluated in 64 bits);
 * the query gives -8 for a null output, -6 for w or h below 1 or a size above
 * INT_MAX.
 * Checks, in order: null src, markers or buffer -8; w or h < 1 -6; srcStep
 * below w x channels, markersStep below the marker row bytes -14; a 16u
 * markersStep not a multiple of 2 -108; a ROI whose buffer the query refuses
 * -6; norm not zelNormInf or zelNormL1 -5; flag not 0 or 1 -5. */
enum { zelSegmentNoLines = 0, zelSegmentLines = 1 };
ZELCV_API ZelStatus ZELCV_CALL zeliSegmentWatershedGetBufferSize_8u_C1R(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliSegmentWatershedGetBufferSize_8u16u_C1R(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliSegmentWatershed_8u_C1IR(const Zel8u* src, int srcStep, Zel8u* markers,
                                                            int markersStep, ZeliSize roiSize, int norm, int flag,
                                                            Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliSegmentWatershed_8u16u_C1IR(const Zel8u* src, int srcStep, Zel16u* markers,
                                                               int markersStep, ZeliSize roiSize, int norm,
                                                               int flag, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliSegmentGradientGetBufferSize_8u_C1R(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliSegmentGradientGetBufferSize_8u_C3R(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliSegmentGradient_8u_C1IR(const Zel8u* src, int srcStep, Zel8u* markers,
                                                           int markersStep, ZeliSize roiSize, int norm, int flag,
                                                           Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliSegmentGradient_8u_C3IR(const Zel8u* src, int srcStep, Zel8u* markers,
                                                           int markersStep, ZeliSize roiSize, int norm, int flag,
                                                           Zel8u* buffer);

/* ---- Boundary marking ------------------------------------------------- */
/* A pixel is set to val when its value differs from that of its right or
 * lower neighbour (zelNormInf: also the lower-left and lower-right ones)
 * inside the ROI; every comparison sees the values on entry. Marked pixels
 * form lines one pixel thick on the upper-left side of each change. No
 * buffer. Checks: null image -8; w or h < 1 -6; step below the row bytes
 * -14; a 16u or 32s step not a multiple of the element size -108; norm not
 * zelNormInf or zelNormL1 -5. */
ZELCV_API ZelStatus ZELCV_CALL zeliBoundSegments_8u_C1IR(Zel8u* markers, int markersStep, ZeliSize roiSize,
                                                         Zel8u val, int norm);
ZELCV_API ZelStatus ZELCV_CALL zeliBoundSegments_16u_C1IR(Zel16u* markers, int markersStep, ZeliSize roiSize,
                                                          Zel16u val, int norm);
ZELCV_API ZelStatus ZELCV_CALL zeliBoundSegments_32s_C1IR(Zel32s* markers, int markersStep, ZeliSize roiSize,
                                                          Zel32s val, int norm);

/* ---- Inpainting ------------------------------------------------------- */
/* Fills the pixels of a mask (non-zero = unknown) from their surroundings by
 * fast marching: unknown pixels are filled in the order of their distance T
 * from the known pixels, each from the known pixels around it.
 * InitAlloc measures T and fixes the order:
 *   known pixels with an unknown 4-neighbour start at T = 0; T spreads into
 *   the unknown pixels, and into the known pixels up to a distance of
 *   radius + 2 (stored negated there; farther known pixels hold
 *   -(radius + 2)), by the first-order eikonal update from the 4-neighbours
 *   in single precision (the smaller horizontal and vertical values a, b:
 *   (a + b + sqrt(2 - (a - b)^2)) / 2 when |a - b| < 1, else min(a, b) + 1),
 *   the pixel of least T (ties: least raster index) being fixed first.
 *   The unknown pixels are filled in the order they were fixed.
 * Inpaint copies src to dst outside the mask (nothing to do in place) and
 * then fills each unknown pixel p, in that order, from every known pixel q
 * (outside the mask, or filled before p) with 0 < |p - q|^2 <= radius^2:
 *   I(p) = sum w (I(q) + g(q) . (p - q)) / sum w, with
 *   w = max(|n . (p - q)| / |p - q|, 1e-6) / |p - q|^2 / (1 + |T(q) - T(p)|),
 *   n the unit vector of T's central-difference gradient at p (one-sided at
 *   the ROI edge; 0 when that gradient is 0), and g(q) I's gradient at q by central differences over
 *   known pixels (a one-sided difference where one side is unknown or outside
 *   the ROI, 0 where both are); per channel in single precision, then
 *   clamped to 0..255 and rounded half up.
 * Only the unknown pixels of dst change from src; src is only read (dst may
 * be src, with the same step).
 * A mask covering the whole ROI has no edge: nothing is filled.
 * The state is one block, released by zeliInpaintFree_8u_C1R or _C3R: a
 * 64-byte head, 8 w h bytes of distances and fill ranks, 4 bytes per unknown
 * pixel and 16 per offset of the radius disc (each part rounded up to 16).
 * InitAlloc also allocates, and frees before returning, 11 w h + 16 bytes of
 * scratch for the march.
 * InitAlloc checks, in order: null mask or state -8; w or h < 1 -6; maskStep
 * < w -14; radius outside [1, 64] (or NaN) -5; a ROI for which the state with
 * every pixel unknown, or the scratch, exceeds INT_MAX bytes -6; an
 * allocation failure -9 (everything released, *state unchanged).
 * Inpaint checks, in order: null src, dst or state -8; w or h < 1 -6; a step
 * below w x channels -14; a state of another kind -17, built for the other
 * channel count -53, or for another ROI size -6. */
ZELCV_API ZelStatus ZELCV_CALL zeliInpaintInitAlloc_8u_C1R(const Zel8u* mask, int maskStep, ZeliSize roiSize,
                                                           Zel32f radius, ZeliInpaintState** state);
ZELCV_API ZelStatus ZELCV_CALL zeliInpaintInitAlloc_8u_C3R(const Zel8u* mask, int maskStep, ZeliSize roiSize,
                                                           Zel32f radius, ZeliInpaintState** state);
ZELCV_API ZelStatus ZELCV_CALL zeliInpaint_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                  ZeliSize roiSize, const ZeliInpaintState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliInpaint_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                  ZeliSize roiSize, const ZeliInpaintState* state);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_SEGMENTATION_H */
