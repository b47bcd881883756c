/* zelcv: Haar cascade classifiers.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_HAAR_H
#define ZELCV_HAAR_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Haar classifiers -------------------------------------------------- */
/* A classifier is one stage of a cascade: featureCount weak classifiers, each
 * a feature (a weighted sum of rectangle sums), a feature threshold and two
 * values. Applied to a window whose top-left corner is at integral element
 * (x, y), with nv = norm[y][x] (the window's deviation, see below):
 *
 *   sum = 0 (single precision)
 *   for k = 0 .. featureCount - 1, in order:
 *     f = value of feature k in the window
 *     sum = sum + (f < thresholds[k] x nv ? valuesBelow[k] : valuesAbove[k])
 *   the window is rejected when sum < threshold (the stage threshold).
 *
 * thresholds[k] x nv is one single-precision product; a NaN in it or in f
 * counts as "not below". Every instruction set gives the same bits.
 *
 * Features. Feature k has rectCounts[k] >= 1 consecutive rectangles of rects
 * (feature 0 takes the first rectCounts[0], feature 1 the next ...), each with
 * its weight at the same index of weights. A rectangle (x, y, w, h) is given
 * relative to the window. Upright, it covers the source pixels of columns
 * x .. x + w - 1 and rows y .. y + h - 1 of the window, and its sum is read
 * from the plain integral I at the window's origin as
 *   S = (I[y + h][x + w] - I[y + h][x]) - (I[y][x + w] - I[y][x]).
 * Tilted, (x, y) is the rectangle's top corner in the tilted integral T, w
 * runs down to the right and h down to the left, as in zeliTiltedRectStdDev
 * (its top row is source row y of the window, columns x - 1 and x; it holds
 * 2 w h pixels):
 *   S = (T[y + w + h][x + w - h] - T[y + h][x - h]) - (T[y + w][x + w] - T[y][x]).
 *
 * 32f classifiers (weights Zel32f) on Zel32f integrals: S in single
 * precision in the order written above, and
 * f = ((w0 S0 + w1 S1) + w2 S2) + ..., each product and sum rounded to single
 * precision (no fused multiply-add).
 * 32s classifiers (weights Zel32s) on Zel32s integrals: S and
 * f = w0 S0 + w1 S1 + ... in 32-bit integer arithmetic that wraps modulo
 * 2^32 (exact for any real cascade on 8-bit images: |f| < 2^31), then f is
 * converted once to single precision (round to nearest even).
 *
 * Rectangles: x >= 0, y >= 0, w >= 1, h >= 1; a tilted rectangle also needs
 * x >= h (its left corner lies in the window). The classifier's size
 * (zeliGetHaarClassifierSize) is the smallest (width, height) such that every
 * integral element the classifier reads lies at (x + i, y + j) with
 * 0 <= i <= width, 0 <= j <= height from the window's origin: upright
 * rectangles reach column x + w and row y + h, tilted ones column x + w and
 * row y + w + h.
 *
 * Deviation. norm is one Zel32f per window, usually the rectangle standard
 * deviation of a region of the window (zeliRectStdDev over the window's
 * inner rectangle). Feature thresholds are compared with thresholds[k] x nv,
 * so a cascade trained on features divided by (n x deviation), with n pixels
 * in that region, has its thresholds multiplied by n when converted.
 *
 * Building. InitAlloc copies the arrays into one block of library memory;
 * the caller's arrays are not kept. Checks: null classifier, rects, weights,
 * thresholds, valuesBelow, valuesAbove or rectCounts -8; featureCount < 1,
 * any rectCounts[k] < 1, a rectangle outside the rules above, or a size or
 * rectangle total beyond INT_MAX -6; allocation failure -9 (nothing is
 * returned). zeliHaarClassifierInitAlloc makes every feature upright,
 * zeliTiltedHaarClassifierInitAlloc every feature tilted. */
typedef struct ZeliHaarClassifier_32f ZeliHaarClassifier_32f;
typedef struct ZeliHaarClassifier_32s ZeliHaarClassifier_32s;

ZELCV_API ZelStatus ZELCV_CALL zeliHaarClassifierInitAlloc_32f(ZeliHaarClassifier_32f** classifier,
                                                               const ZeliRect* rects, const Zel32f* weights,
                                                               const Zel32f* thresholds,
                                                               const Zel32f* valuesBelow,
                                                               const Zel32f* valuesAbove, const int* rectCounts,
                                                               int featureCount);
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedHaarClassifierInitAlloc_32f(
    ZeliHaarClassifier_32f** classifier, const ZeliRect* rects, const Zel32f* weights, const Zel32f* thresholds,
    const Zel32f* valuesBelow, const Zel32f* valuesAbove, const int* rectCounts, int featureCount);
ZELCV_API ZelStatus ZELCV_CALL zeliHaarClassifierInitAlloc_32s(ZeliHaarClassifier_32s** classifier,
                                                               const ZeliRect* rects, const Zel32s* weights,
                                                               const Zel32f* thresholds,
                                                               const Zel32f* valuesBelow,
                                                               const Zel32f* valuesAbove, const int* rectCounts,
                                                               int featureCount);
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedHaarClassifierInitAlloc_32s(
    ZeliHaarClassifier_32s** classifier, const ZeliRect* rects, const Zel32s* weights, const Zel32f* thresholds,
    const Zel32f* valuesBelow, const Zel32f* valuesAbove, const int* rectCounts, int featureCount);

/* Releases a classifier; Free(NULL) returns -8. */
ZELCV_API ZelStatus ZELCV_CALL zeliHaarClassifierFree_32f(ZeliHaarClassifier_32f* classifier);
ZELCV_API ZelStatus ZELCV_CALL zeliHaarClassifierFree_32s(ZeliHaarClassifier_32s* classifier);

/* Writes the classifier's size (see above): the integral images of an
 * application over a w x h ROI need w + size.width columns and
 * h + size.height rows from the first window's origin. Checks: null
 * classifier or size -8. */
ZELCV_API ZelStatus ZELCV_CALL zeliGetHaarClassifierSize_32f(const ZeliHaarClassifier_32f* classifier,
                                                             ZeliSize* size);
ZELCV_API ZelStatus ZELCV_CALL zeliGetHaarClassifierSize_32s(const ZeliHaarClassifier_32s* classifier,
                                                             ZeliSize* size);

/* Makes feature k tilted where mask[k] is non-zero and upright where it is
 * zero (mask has one byte per feature), and updates the size. Checks: null
 * mask or classifier -8; a feature that would be tilted with x < h -6, in
 * which case nothing changes. */
ZELCV_API ZelStatus ZELCV_CALL zeliTiltHaarFeatures_32f(const Zel8u* mask, ZeliHaarClassifier_32f* classifier);
ZELCV_API ZelStatus ZELCV_CALL zeliTiltHaarFeatures_32s(const Zel8u* mask, ZeliHaarClassifier_32s* classifier);

/* Applies a classifier to every window of roiSize whose mask byte is
 * non-zero: window (x, y) has its origin at src[y][x] (and tilt[y][x]), its
 * deviation at norm[y][x] and its decision at mask[y][x]. A rejected window's
 * mask byte becomes 0; an accepted one keeps its byte; windows whose byte is
 * 0 are not evaluated. *positiveCount receives the number of non-zero mask
 * bytes in the ROI afterwards. A cascade is applied stage by stage on the
 * same mask. The integrals need roiSize.width + size.width columns and
 * roiSize.height + size.height rows (size as zeliGetHaarClassifierSize).
 * Checks: null src (tilt), norm, mask, positiveCount or classifier -8;
 * w or h < 1 -6; srcStep (tiltStep) < (w + size.width) x 4, normStep < 4w or
 * maskStep < w -14; a src, tilt or norm step not a multiple of 4 -108; then
 * a classifier holding tilted features passed to ApplyHaarClassifier, or
 * one of the other element type, -17. Nothing is written on failure. A
 * count above INT_MAX is written as INT_MAX. */
ZELCV_API ZelStatus ZELCV_CALL zeliApplyHaarClassifier_32f_C1R(const Zel32f* src, int srcStep, const Zel32f* norm,
                                                               int normStep, Zel8u* mask, int maskStep,
                                                               ZeliSize roiSize, int* positiveCount,
                                                               Zel32f threshold,
                                                               const ZeliHaarClassifier_32f* classifier);
ZELCV_API ZelStatus ZELCV_CALL zeliApplyHaarClassifier_32s32f_C1R(const Zel32s* src, int srcStep,
                                                                  const Zel32f* norm, int normStep, Zel8u* mask,
                                                                  int maskStep, ZeliSize roiSize,
                                                                  int* positiveCount, Zel32f threshold,
                                                                  const ZeliHaarClassifier_32s* classifier);
/* Upright features read src (a plain integral), tilted ones tilt (a tilted
 * integral as zeliTiltedIntegral makes it, in the same window coordinates). */
ZELCV_API ZelStatus ZELCV_CALL zeliApplyMixedHaarClassifier_32f_C1R(const Zel32f* src, int srcStep,
                                                                    const Zel32f* tilt, int tiltStep,
                                                                    const Zel32f* norm, int normStep, Zel8u* mask,
                                                                    int maskStep, ZeliSize roiSize,
                                                                    int* positiveCount, Zel32f threshold,
                                                                    const ZeliHaarClassifier_32f* classifier);
ZELCV_API ZelStatus ZELCV_CALL zeliApplyMixedHaarClassifier_32s32f_C1R(
    const Zel32s* src, int srcStep, const Zel32s* tilt, int tiltStep, const Zel32f* norm, int normStep,
    Zel8u* mask, int maskStep, ZeliSize roiSize, int* positiveCount, Zel32f threshold,
    const ZeliHaarClassifier_32s* classifier);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_HAAR_H */
