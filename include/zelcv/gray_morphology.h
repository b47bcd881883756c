/* zelcv: Grey-level morphology and morphological reconstruction.
 * Part of the public interface; "zelcv.h" includes every family.
 * The reference page is docs/morphology.md. */
#ifndef ZELCV_GRAY_MORPHOLOGY_H
#define ZELCV_GRAY_MORPHOLOGY_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Grey-level (non-flat) dilation and erosion -------------------------
 * A structuring function is a row-major array of maskSize.width x
 * maskSize.height values (Zel32s for 8u images, Zel32f for 32f images, no
 * row padding); every element takes part. With (ax, ay) the anchor and
 * s(x, y) the source, extended beyond the ROI as the border says:
 *
 *   8u dilation  dst = clamp(max over i, j of s(x + i - ax, y + j - ay) + v(i, j))
 *   8u erosion   dst = clamp(min over i, j of s(x + i - ax, y + j - ay) - v(i, j))
 *
 * where the sums are exact integers and clamp saturates to 0..255. So an
 * element of value -255 or less never changes a result (a flat element
 * that is off), one of 255 or more makes a dilation 255 and an erosion 0.
 *
 *   32f dilation dst = max over i, j of s(...) + v(i, j), in single precision
 *   32f erosion  dst = min over i, j of s(...) - v(i, j)
 *
 * taken in row-major order of the elements, starting from -inf (dilation)
 * or +inf (erosion); a term replaces the running value only when it is
 * strictly greater (smaller): NaN terms are ignored, and between equal terms
 * (+0 and -0) the first one stays. An element of value -inf is off; when
 * every term is NaN or off the result is -inf (+inf for erosion).
 * A function of 0 where a flat mask is on and off values elsewhere gives
 * exactly the flat dilation and erosion of zelcv/morphology.h with that mask
 * and anchor (for a mask with at least one element on).
 *
 * Border (borderType): zelBorderReplicate (1), pixels outside the ROI repeat
 * the nearest ROI pixel; with the side flags zelBorderInMemTop/Bottom/Left/
 * Right the rows above/below or columns left/right of the ROI are read from
 * the caller's memory (up to the element's reach: ay rows above, mh-1-ay
 * below, ax columns left, mw-1-ax right); zelBorderInMemory (6) is 1 with
 * all four flags. A row read from memory above or below the ROI is itself
 * extended left and right by the same rules. Other kinds: -225.
 *
 * State: the structuring function, the anchor and the maximum ROI width,
 * with the working rows. The state is written by every call (its working
 * rows), so two threads need two states; it is used where it was built.
 *
 *   stateSize = 128 + 48 A + 8 mh + mh * align32((roiWidth + mw - 1) * e)
 *
 * with A = mw * mh, e = 1 for 8u and 4 for 32f, align32 rounding up to a
 * multiple of 32; computed in 64 bits, a size above INT_MAX gives -6.
 *
 * Checks, in order:
 *   GetSize:    stateSize null -8; roiWidth, maskSize.width or height below 1
 *               -6; the size above INT_MAX -6.
 *   Init:       mask or state null -8 (InitAlloc: mask or stateOut); then as
 *               GetSize; anchor outside the function -34; InitAlloc: -9 when
 *               the allocation fails (*stateOut is left as it was).
 *   Free:       null -8, else the state is released.
 *   Dilate/Erode: src, dst or state null -8; ROI width or height below 1 -6;
 *               srcStep, then dstStep below the row bytes -14; 32f steps not
 *               a multiple of 4 -108; the border kind neither 1 nor 6 -225;
 *               a state of the other element type -12; a ROI wider than the
 *               state's roiWidth -6.
 * src == dst (in place) is allowed; otherwise the images must not overlap. */
typedef struct ZeliMorphGrayState ZeliMorphGrayState;

ZELCV_API ZelStatus ZELCV_CALL zeliMorphGrayGetSize_8u_C1R(int roiWidth, ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGrayInit_8u_C1R(int roiWidth, const Zel32s* mask, ZeliSize maskSize,
                                                        ZeliPoint anchor, ZeliMorphGrayState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGrayInitAlloc_8u_C1R(int roiWidth, const Zel32s* mask, ZeliSize maskSize,
                                                             ZeliPoint anchor, ZeliMorphGrayState** stateOut);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGrayFree_8u_C1R(ZeliMorphGrayState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliGrayDilateBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                           ZeliSize roiSize, ZeliBorderType borderType,
                                                           ZeliMorphGrayState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliGrayErodeBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                          ZeliSize roiSize, ZeliBorderType borderType,
                                                          ZeliMorphGrayState* state);

ZELCV_API ZelStatus ZELCV_CALL zeliMorphGrayGetSize_32f_C1R(int roiWidth, ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGrayInit_32f_C1R(int roiWidth, const Zel32f* mask, ZeliSize maskSize,
                                                         ZeliPoint anchor, ZeliMorphGrayState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGrayInitAlloc_32f_C1R(int roiWidth, const Zel32f* mask,
                                                              ZeliSize maskSize, ZeliPoint anchor,
                                                              ZeliMorphGrayState** stateOut);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGrayFree_32f_C1R(ZeliMorphGrayState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliGrayDilateBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                            int dstStep, ZeliSize roiSize,
                                                            ZeliBorderType borderType, ZeliMorphGrayState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliGrayErodeBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                           int dstStep, ZeliSize roiSize,
                                                           ZeliBorderType borderType, ZeliMorphGrayState* state);

/* ---- Morphological reconstruction ---------------------------------------
 * srcDst holds the marker on entry and the result on return; mask is the
 * reference image, of the same type. norm chooses the connectivity:
 * zelNormInf 8 neighbours, zelNormL1 4 neighbours.
 *
 * Reconstruction by dilation: the marker is first lowered to the mask where
 * it lies above it (m = min(marker, mask)); the result is the limit of
 * m <- min(dilate(m), mask), dilate the maximum over the pixel and its
 * neighbours inside the ROI (nothing outside the ROI takes part). That is,
 * each pixel gets the largest value h such that a path of neighbours joins
 * it to a pixel whose lowered marker is at least h, through pixels whose
 * mask is at least h. Reconstruction by erosion is the dual: the marker is
 * first raised to the mask, and m <- max(erode(m), mask). Every result value
 * is a value of the marker or of the mask (no arithmetic): all types give
 * exact results. 32f and 64f images must hold no NaN (the call still ends
 * and writes only srcDst, but the result is then not defined).
 *
 * Method: a raster and an anti-raster scan, then a first-in first-out queue
 * of the pixels that can still raise (lower) a neighbour; the work buffer
 * holds copies of marker and mask with a one-pixel frame, the queue and a
 * flag per pixel:
 *
 *   bufferSize = (W + 2)(H + 2)(2 e + 1) + 4 W H + 64
 *
 * W, H the ROI size and e the element size (1, 2, 4, 8 for 8u, 16u, 32f,
 * 64f); computed in 64 bits, above INT_MAX -6. The untyped query takes the
 * type code (zel8u, zel16u, zel32f or zel64f; others -12).
 *
 * Checks, in order:
 *   GetBufferSize: bufferSize null -8; width or height below 1 -6; (untyped)
 *               the data type -12; the size above INT_MAX -6.
 *   Reconstruct: srcDst, mask or buffer null -8; width or height below 1 -6;
 *               srcDstStep, then maskStep below the row bytes -14; 16u, 32f,
 *               64f steps not a multiple of the element size -108; norm
 *               neither zelNormInf nor zelNormL1 -229; the buffer holds at
 *               least bufferSize bytes at any address. */
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructGetBufferSize(ZeliSize roiSize, ZelDataType dataType,
                                                                 int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructGetBufferSize_8u_C1(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructGetBufferSize_16u_C1(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructGetBufferSize_32f_C1(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructGetBufferSize_64f_C1(ZeliSize roiSize, int* bufferSize);

ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructDilate_8u_C1IR(Zel8u* srcDst, int srcDstStep, const Zel8u* mask,
                                                                  int maskStep, ZeliSize roiSize, int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructErode_8u_C1IR(Zel8u* srcDst, int srcDstStep, const Zel8u* mask,
                                                                 int maskStep, ZeliSize roiSize, int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructDilate_16u_C1IR(Zel16u* srcDst, int srcDstStep, const Zel16u* mask,
                                                                   int maskStep, ZeliSize roiSize, int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructErode_16u_C1IR(Zel16u* srcDst, int srcDstStep, const Zel16u* mask,
                                                                  int maskStep, ZeliSize roiSize, int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructDilate_32f_C1IR(Zel32f* srcDst, int srcDstStep, const Zel32f* mask,
                                                                   int maskStep, ZeliSize roiSize, int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructErode_32f_C1IR(Zel32f* srcDst, int srcDstStep, const Zel32f* mask,
                                                                  int maskStep, ZeliSize roiSize, int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructDilate_64f_C1IR(Zel64f* srcDst, int srcDstStep, const Zel64f* mask,
                                                                   int maskStep, ZeliSize roiSize, int norm, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphReconstructErode_64f_C1IR(Zel64f* srcDst, int srcDstStep, const Zel64f* mask,
                                                                  int maskStep, ZeliSize roiSize, int norm, Zel8u* buffer);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_GRAY_MORPHOLOGY_H */
