/* zelcv: Distance transforms.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_DISTANCE_H
#define ZELCV_DISTANCE_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Distance transforms ------------------------------------------------ */
/* Every transform measures, for each pixel, the distance to the nearest pixel
 * whose source value is 0 (the features); a feature pixel itself gets 0.
 *
 * Standard chamfer weights. kerSize 3 gives two weights (orthogonal step,
 * diagonal step), kerSize 5 three (orthogonal, diagonal, the step of one row
 * and two columns or two rows and one column):
 *
 *   kerSize, norm   32s          32f (nearest single-precision values)
 *   3, 0            1, 1         1.0, 1.0          chessboard
 *   3, 1            1, 2         1.0, 2.0          city block
 *   3, 2            2, 3         0.955, 1.3693     near Euclidean
 *   5, 0            1, 1, 2      1.0, 1.0, 2.0
 *   5, 1            1, 2, 3      1.0, 2.0, 3.0
 *   5, 2            5, 7, 11     1.0, 1.4, 2.1969
 *
 * Checks: null metrics -8; kerSize not 3 or 5 -6; norm not 0..2 -5.
 * zeliGetDistanceTransformMask takes maskType = 10 kerSize + norm (30, 31,
 * 32, 50, 51, 52) and writes the 32f weights: null metrics -8, maskType % 10
 * outside 0..2 -5, maskType / 10 not 3 or 5 -6. */
ZELCV_API ZelStatus ZELCV_CALL zeliGetDistanceTransformMask_32s(int kerSize, int norm, Zel32s* metrics);
ZELCV_API ZelStatus ZELCV_CALL zeliGetDistanceTransformMask_32f(int kerSize, int norm, Zel32f* metrics);
ZELCV_API ZelStatus ZELCV_CALL zeliGetDistanceTransformMask(int maskType, Zel32f* metrics);

/* Chamfer transforms. With a the orthogonal, b the diagonal and (5x5) c the
 * knight-step weight, the result at each pixel is the cost of the cheapest
 * path of such steps from a feature pixel, computed by two passes:
 *   forward, rows top to bottom, each left to right: a feature pixel gets 0,
 *   any other the minimum of M and, where the neighbour lies inside the ROI,
 *   left + a, upper-left + b, upper + a, upper-right + b (5x5 also: the
 *   pixels two columns left and right one row up, and one column left and
 *   right two rows up, + c);
 *   backward, rows bottom to top, each right to left: the minimum of the
 *   pixel itself and the mirrored neighbours (right + a, lower-right + b,
 *   lower + a, lower-left + b, 5x5 the mirrored knight steps + c).
 * M is 255 for 8u results and 65535 for 16u results, and every integer sum
 * saturates at M, so an integer result is min(M, path cost); a pixel no
 * feature reaches (an image without 0 pixels) gets M. 32f results use single
 * precision sums with M the largest finite float and no saturation (a sum
 * that overflows to infinity loses against M). For weights with
 * a <= b <= 2a (5x5 also 2a <= c <= a + b) the passes give exactly the
 * cheapest path cost.
 * When a > b and the ROI is at least 2 x 2, the passes run with the weights
 * b, b (5x5: b, b, 2b, the sums saturated for integers): the result is b
 * times the chessboard distance.
 * Checks: null src, dst or metrics -8; width or height < 1 -6; srcStep <
 * width, dstStep < width x result element size -14; a 16u step not a multiple
 * of 2, a 32f step not a multiple of 4 -108; an integer weight below 1, or a
 * float weight not above 0 (also NaN), -56. The in-place (C1IR) forms take
 * one 8u image as source and result. */
ZELCV_API ZelStatus ZELCV_CALL zeliDistanceTransform_3x3_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                const Zel32s* metrics);
ZELCV_API ZelStatus ZELCV_CALL zeliDistanceTransform_3x3_8u_C1IR(Zel8u* srcDst, int srcDstStep, ZeliSize roiSize,
                                                                 const Zel32s* metrics);
ZELCV_API ZelStatus ZELCV_CALL zeliDistanceTransform_3x3_8u16u_C1R(const Zel8u* src, int srcStep, Zel16u* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   const Zel32s* metrics);
ZELCV_API ZelStatus ZELCV_CALL zeliDistanceTransform_3x3_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   const Zel32f* metrics);
ZELCV_API ZelStatus ZELCV_CALL zeliDistanceTransform_5x5_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                const Zel32s* metrics);
ZELCV_API ZelStatus ZELCV_CALL zeliDistanceTransform_5x5_8u_C1IR(Zel8u* srcDst, int srcDstStep, ZeliSize roiSize,
                                                                 const Zel32s* metrics);
ZELCV_API ZelStatus ZELCV_CALL zeliDistanceTransform_5x5_8u16u_C1R(const Zel8u* src, int srcStep, Zel16u* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   const Zel32s* metrics);
ZELCV_API ZelStatus ZELCV_CALL zeliDistanceTransform_5x5_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   const Zel32f* metrics);

/* Exact Euclidean transform: every result is sqrt(dx^2 + dy^2) for the
 * nearest feature pixel, rounded to single precision (correctly rounded while
 * dx^2 + dy^2 < 2^24; above, the double-precision root rounded to float).
 * An image without any 0 pixel gives the largest finite float everywhere.
 * Buffer: 24 max(align4(width), align4(height)) + 56 bytes, align4 rounding
 * up to a multiple of 4; the query gives -8 for a null output, -6 for a
 * width or height below 1 or a size above INT_MAX bytes.
 * Checks: null src, dst or buffer -8; width or height < 1 -6; srcStep <
 * width, dstStep < 4 width -14; dstStep not a multiple of 4 -108; a ROI
 * whose buffer size the query refuses -6. */
ZELCV_API ZelStatus ZELCV_CALL zeliTrueDistanceTransformGetBufferSize_8u32f_C1R(ZeliSize roiSize,
                                                                                int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliTrueDistanceTransform_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   Zel8u* buffer);

/* Fast marching: a signed distance to the boundary between the 0 pixels
 * (inside, negative) and the non-zero pixels (outside, positive), r = radius.
 * Start values: a 0 pixel with a non-zero 4-neighbour (a boundary pixel) 0,
 * any other 0 pixel -r, a non-zero pixel +r. When r > 0, rounds of four
 * sweeps (rows top to bottom and bottom to top, each left to right and right
 * to left) follow until a round changes nothing. Each sweep visits every
 * pixel once; with t1 its horizontal and t2 its vertical neighbour on the side
 * the sweep comes from (+r outside the ROI for a non-zero pixel, -r for a 0
 * pixel) and d = t1 - t2:
 *   non-zero pixel: t1, t2 raised to at least 0; candidate
 *     (t1 + t2 + sqrt(2 - d^2)) / 2 when |d| < 1, else min(t1, t2) + 1;
 *     the pixel keeps the smaller of its value and the candidate;
 *   0 pixel, when t1 <= 0, t2 <= 0 and not both are 0: candidate
 *     (t1 + t2 - sqrt(2 - d^2)) / 2 when |d| < 1, else max(t1, t2) - 1;
 *     the pixel keeps the larger of its value and the candidate.
 * Arithmetic is single precision (sqrt correctly rounded). Every result lies
 * in [-r, r]; with r = 0 the start values are the result (-r being -0.0).
 * Buffer: (height + 34) x (align32(width) OR 5) + 40 bytes, align32 rounding
 * up to a multiple of 32 and OR the bitwise or (not a sum); the query gives
 * -8 for a null output, -6 for a width or height below 1 or a size above
 * INT_MAX bytes.
 * Checks: null src, dst or buffer -8; width or height < 1 -6; srcStep <
 * width, dstStep < 4 width -14; dstStep not a multiple of 4 -108; a ROI
 * whose buffer size the query refuses -6; radius < 0 (or NaN) -5. */
ZELCV_API ZelStatus ZELCV_CALL zeliFastMarchingGetBufferSize_8u32f_C1R(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFastMarching_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                          int dstStep, ZeliSize roiSize, Zel32f radius,
                                                          Zel8u* buffer);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_DISTANCE_H */
