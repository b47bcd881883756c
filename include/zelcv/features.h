/* zelcv: corner measures, 3x3 peaks, FAST corners, Hough lines and line
 * suppression.
 * Part of the public interface; "zelcv.h" includes every family.
 * docs/features.md has the same contract with worked details. */
#ifndef ZELCV_FEATURES_H
#define ZELCV_FEATURES_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Corner measures ---------------------------------------------------- *
 * Derivatives: filterType zelFilterSobel with mask zelMaskSize3x3 or 5x5, or
 * zelFilterScharr with zelMaskSize3x3 (the taps of zelcv/filters.h, computed
 * with the border type on the source). Each derivative is scaled:
 *     fx = dx * s, fy = dy * s,  s = 1 / (2^(K-1) * B) (float), K = 3 or 5,
 *     Scharr 1 / (8 B); 8u sources also divide by 255 (s = 1 / (255 * ...)).
 * 8u sources: dx, dy are the exact integers, converted to float and
 * multiplied by s. 32f sources: the sums of the 32f derivative filters
 * (zelcv/filters.h): per row y-r..y+r, the row taps over that row in double
 * (tap 0 first, every tap) rounded once to float, then the column taps over
 * those row sums in float (tap 0 first, a multiplication then an addition
 * per tap), then the product with s.
 * Products xx = fx*fx, xy = fx*fy, yy = fy*fy (float) are summed over a
 * B x B block (blockSize B, 1 .. 31) covering columns x - B/2 .. x - B/2 + B - 1
 * and the same rows (B/2 rounded down): first down each column, topmost row
 * first, then across the column sums, leftmost first, all in float. Block
 * positions outside the ROI take the product at the border position
 * (zelBorderReplicate, zelBorderWrap, zelBorderMirror, zelBorderMirrorWithEdge)
 * or zero (zelBorderConstant, whose source pixels outside are borderValue).
 * In-memory kinds and side flags give zelStatusBadBorder.
 * Responses from the sums Sxx, Sxy, Syy (float unless said):
 *   MinEigenVal  a = Sxx * 0.5, c = Syy * 0.5, b = Sxy:
 *                (a + c) - sqrt((a - c) * (a - c) + b * b)
 *   HarrisCorner (Sxx * Syy - Sxy * Sxy) - k * ((Sxx + Syy) * (Sxx + Syy))
 *   EigenValsVecs six floats a pixel (dst holds 6 * width values a row):
 *                l1, l2, x1, y1, x2, y2, in double: u = (Sxx + Syy) / 2,
 *                v = sqrt((Sxx - Syy)^2 / 4 + Sxy^2), l1 = u + v, l2 = u - v;
 *                the vector of l is (Sxy, l - Sxx), or (l - Syy, Sxy) when
 *                |Sxy| + |l - Sxx| < 1e-4 (and scaled by 1 / (|x| + |y| +
 *                FLT_EPSILON) if that sum is also below 1e-4), divided by
 *                sqrt(x^2 + y^2 + DBL_EPSILON); each value rounded to float.
 * Checks: pointers -8, size -6, steps -14, 32f step alignment -108, filter
 * type or mask (Scharr 5x5 included) -33, block size -33, border -225,
 * k not finite -5. The queries check the pointer, size, mask -33 and block
 * size -33; one buffer formula serves every corner measure and both source
 * types: (12 * B + 40) * W + 16 * B + 256 bytes. */

ZELCV_API ZelStatus ZELCV_CALL zeliMinEigenValGetBufferSize_8u32f_C1R(ZeliSize roiSize, int mask, int blockSize,
                                                                      int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMinEigenValGetBufferSize_32f_C1R(ZeliSize roiSize, int mask, int blockSize,
                                                                    int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMinEigenVal_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                                         ZeliSize roiSize, int filterType, int mask, int blockSize,
                                                         ZeliBorderType borderType, Zel8u borderValue,
                                                         Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMinEigenVal_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                                                       ZeliSize roiSize, int filterType, int mask, int blockSize,
                                                       ZeliBorderType borderType, Zel32f borderValue,
                                                       Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliEigenValsVecsGetBufferSize_8u32f_C1R(ZeliSize roiSize, int mask, int blockSize,
                                                                        int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliEigenValsVecsGetBufferSize_32f_C1R(ZeliSize roiSize, int mask, int blockSize,
                                                                      int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliEigenValsVecs_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                           int dstStep, ZeliSize roiSize, int filterType, int mask,
                                                           int blockSize, ZeliBorderType borderType,
                                                           Zel8u borderValue, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliEigenValsVecs_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                                                         ZeliSize roiSize, int filterType, int mask, int blockSize,
                                                         ZeliBorderType borderType, Zel32f borderValue,
                                                         Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliHarrisCornerGetBufferSize(ZeliSize roiSize, int mask, int blockSize,
                                                             int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliHarrisCorner_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                                          ZeliSize roiSize, int filterType, int mask, int blockSize,
                                                          Zel32f k, ZeliBorderType borderType, Zel8u borderValue,
                                                          Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliHarrisCorner_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                                                        ZeliSize roiSize, int filterType, int mask, int blockSize,
                                                        Zel32f k, ZeliBorderType borderType, Zel32f borderValue,
                                                        Zel8u* buffer);

/* ---- 3x3 peaks ------------------------------------------------------------ *
 * A pixel is a peak when its value is strictly above threshold and no
 * neighbour inside the ROI is greater (equal neighbours do not prevent it, so
 * every pixel of a flat top is a peak). norm zelNormInf: the 8 neighbours;
 * zelNormL1: the 4 edge neighbours. Pixels closer than `border` (>= 0) to a
 * ROI edge are not reported. Peaks are written in raster order (row by row,
 * left to right) as {x, y} relative to the ROI; at most `capacity`: when more
 * exist, the first `capacity` are written and the call returns
 * zelStatusOutputFull (33). *count is the number written.
 * Checks: pointers -8, size -6, step -14, alignment -108, capacity < 0 or
 * border < 0 -5, norm not L1/Inf -229, threshold NaN -5.
 * Buffer: 12 * (W + 2) + 64 bytes (both types). */
ZELCV_API ZelStatus ZELCV_CALL zeliFindPeaks3x3GetBufferSize_32f_C1R(int roiWidth, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFindPeaks3x3GetBufferSize_32s_C1R(int roiWidth, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFindPeaks3x3_32f_C1R(const Zel32f* src, int srcStep, ZeliSize roiSize,
                                                        Zel32f threshold, int norm, int border, ZeliPoint* peaks,
                                                        int capacity, int* count, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFindPeaks3x3_32s_C1R(const Zel32s* src, int srcStep, ZeliSize roiSize,
                                                        Zel32s threshold, int norm, int border, ZeliPoint* peaks,
                                                        int capacity, int* count, Zel8u* buffer);

/* ---- FAST corners ---------------------------------------------------------- *
 * Circle of radius r = 1, 2 or 3: the n = 8, 12 or 16 pixels of the discrete
 * circle, in cyclic order (offsets dx,dy from the top, clockwise):
 *   r=3: (0,-3)(1,-3)(2,-2)(3,-1)(3,0)(3,1)(2,2)(1,3)(0,3)(-1,3)(-2,2)(-3,1)
 *        (-3,0)(-3,-1)(-2,-2)(-1,-3)
 *   r=2: (0,-2)(1,-2)(2,-1)(2,0)(2,1)(1,2)(0,2)(-1,2)(-2,1)(-2,0)(-2,-1)(-1,-2)
 *   r=1: (0,-1)(1,-1)(1,0)(1,1)(0,1)(-1,1)(-1,0)(-1,-1)
 * A circle pixel p of a centre v is brighter when p > v + t and darker when
 * p < v - t (threshold t, 0 .. 255). The centre is a corner when at least
 * arcLength (n/2 + 1 .. n) cyclically contiguous circle pixels are all
 * brighter or all darker. Its score is the largest t for which it is still a
 * corner: (the largest, over both kinds and every arc of arcLength pixels,
 * of the smallest |p - v| on the arc) - 1, between t and 254.
 * Only pixels at least r from every ROI edge are examined (the circle is read
 * inside the ROI only). With suppression, a corner is kept only when its
 * score is strictly greater than the scores of its 8 neighbours (0 for
 * pixels that are not corners); without it every corner is kept.
 * zeliFastN_8u_C1R writes, for every ROI pixel, 255 (a kept corner) or 0 into
 * dstCorner, and the score (kept corners) or 0 into dstScore.
 * zeliFastN2DToVec_8u lists the pixels whose corner value is non-zero in
 * raster order, {x, y} and their score; at most `capacity` (more: the first
 * `capacity` and zelStatusOutputFull (33)); *count is the number written.
 * State: zeliFastNGetSize gives its bytes (any alignment), zeliFastNInit
 * builds it: radius 1..3 else -5, arcLength outside n/2+1..n -5, threshold
 * outside 0..255 -5, suppression 0 or 1 else -5. The detector checks:
 * pointers -8, size -6, steps -14, state not built -17, then runs.
 * Buffer: 3 * (W + 2) + 64 bytes. */
typedef struct ZeliFastNState ZeliFastNState;
ZELCV_API ZelStatus ZELCV_CALL zeliFastNGetSize(int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFastNInit(int circleRadius, int arcLength, int threshold, int suppression,
                                             ZeliFastNState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliFastNGetBufferSize(ZeliSize roiSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFastN_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dstCorner, int dstCornerStep,
                                                Zel8u* dstScore, int dstScoreStep, ZeliSize roiSize,
                                                const ZeliFastNState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFastN2DToVec_8u(const Zel8u* srcCorner, int srcCornerStep, const Zel8u* srcScore,
                                                   int srcScoreStep, ZeliSize roiSize, ZeliPoint* points,
                                                   Zel8u* scores, int capacity, int* count);

/* ---- Hough lines ------------------------------------------------------------ *
 * Every non-zero pixel (x, y) of the ROI votes, for each angle index n, in
 * the cell r = round(x * C[n] + y * S[n]) + (R - 1) / 2 (round half to even,
 * the sum in float), where R = round((2 * (W + H) + 1) / drho) rho cells,
 * angle a_n = thetaMin + n * dtheta accumulated in float (a_0 = thetaMin,
 * a_n+1 = a_n + dtheta), C[n] = (float)(cos(a_n) * irho), S[n] =
 * (float)(sin(a_n) * irho) with irho = 1 / drho in float (the products in
 * double), and A = round((thetaMax - thetaMin) / dtheta) angles (in double;
 * R's quotient in float; every round here is to nearest, half to even). delta = {drho, dtheta}, both > 0 and finite.
 * A cell is a line when its votes exceed threshold and it is a local maximum:
 * more votes than the cell before it in rho and in angle, and at least as
 * many as the cell after it in rho and in angle (cells outside count 0).
 * Lines come out by votes, most first, then by angle index, then by rho
 * index; line = {rho, theta} with rho = (r - (R - 1) * 0.5f) * drho and
 * theta = thetaMin + n * dtheta (float). HoughLine: thetaMin = 0, thetaMax =
 * pi. Region: range[0] = {rhoMin, rhoMax} keeps lines with rhoMin <= rho <=
 * rhoMax, range[1] = {thetaMin, thetaMax}, 0 <= thetaMin < thetaMax <= pi.
 * At most `capacity` lines are written; when more exist the call returns
 * zelStatusOutputFull (33); *count is the number written.
 * Checks: pointers -8, size -6, step -14, delta -5, threshold < 0 or
 * capacity < 0 -5, ranges (Region; NaN, empty or outside) -7, a buffer beyond
 * INT_MAX -6. The query checks pointer -8, size -6, delta -5; its size is
 * 4 * ((A + 2) * (R + 2) + A * (R + 1) + 2 * A) + 64 bytes with A the
 * angles of the full range plus one. */
ZELCV_API ZelStatus ZELCV_CALL zeliHoughLineGetSize_8u_C1R(ZeliSize roiSize, ZeliPoint_32f delta, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliHoughLine_8u32f_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                       ZeliPoint_32f delta, int threshold, ZeliPoint_32f* lines,
                                                       int capacity, int* count, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliHoughLine_Region_8u32f_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                              ZeliPoint_32f delta, int threshold,
                                                              const ZeliPoint_32f range[2], ZeliPoint_32f* lines,
                                                              int capacity, int* count, Zel8u* buffer);

/* ---- Probabilistic Hough transform ------------------------------------------ *
 * The state (zeliHoughProbLineGetSize bytes, any alignment) holds the
 * quantisation of HoughLine (thetaMin 0, thetaMax pi), the largest ROI, a
 * seed and the accumulator, point list and mask; each call restarts from the
 * seed, so equal inputs give equal segments. The pixels are visited in a
 * random order: the non-zero pixels in raster order form a list; while it is
 * not empty, index i = next() mod count picks a pixel, which replaces the
 * list entry i by the last one and shortens the list. next() is a 64-bit
 * xorshift* generator: s ^= s >> 12, s ^= s << 25, s ^= s >> 27, output
 * (s * 0x2545F4914F6CDD1D) >> 32; s starts as the seed xor
 * 0x9E3779B97F4A7C15 (or that constant alone when the result would be 0).
 * A picked pixel that an earlier segment already took is skipped. Otherwise
 * it votes in every angle; if no cell reached `threshold` votes it waits.
 * Otherwise from the cell with the most votes (first angle on ties) the
 * line through the pixel along the angle's direction is walked both ways in
 * 16-bit fixed point, one pixel a step along the dominant axis; a walk stops
 * at the ROI edge or after more than lineGap steps without a set pixel. When
 * the segment between the last set pixels of both walks is at least
 * lineLength long along either axis, both walks are repeated, taking every
 * set pixel up to those ends away (its votes withdrawn if the pixel had
 * voted), and the segment {x1, y1, x2, y2} (two ZeliPoint) is recorded;
 * otherwise the pixels remain. The call stops after `capacity` segments
 * (zelStatusOutputFull if pixels were left to visit) or when the list is
 * empty. The source is not modified.
 * Init checks: state -8, size -6, delta -5 (non-positive or not finite),
 * a side above 32767 or a state beyond INT_MAX -6 (the query likewise).
 * Detection checks: pointers -8, size -6, step -14,
 * state not built -17, ROI wider or higher than the state's -6, threshold
 * < 1, lineLength < 0, lineGap < 0 or capacity < 0 -5. State bytes:
 * 32 + 8 A + 4 A (R + 2) + 9 W H + 16 (A = round(pi / dtheta), R as above). */
typedef struct ZeliHoughProbState ZeliHoughProbState;
ZELCV_API ZelStatus ZELCV_CALL zeliHoughProbLineGetSize_8u_C1R(ZeliSize roiSize, ZeliPoint_32f delta,
                                                               int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliHoughProbLineInit_8u32f_C1R(ZeliSize roiSize, ZeliPoint_32f delta,
                                                               unsigned int seed, ZeliHoughProbState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliHoughProbLine_8u32f_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                           int threshold, int lineLength, int lineGap,
                                                           ZeliPoint* segments, int capacity, int* count,
                                                           ZeliHoughProbState* state);

/* ---- Line suppression ------------------------------------------------------- *
 * Keeps the feature pixels (non-zero in `feature`) whose neighbourhood in the
 * grey image `src` is not a straight edge: from the exact 3x3 Sobel
 * derivatives dx, dy of src (replicated border), the integer sums Sxx, Sxy,
 * Syy of dx*dx, dx*dy, dy*dy over the window of windowSize x windowSize
 * (odd, 3 .. 31) centred on the pixel, positions outside the ROI left out;
 * with det = Sxx * Syy - Sxy^2 and tr = Sxx + Syy (64-bit integers) the pixel
 * is kept when (r * tr) * tr < ((r + 1) * (r + 1)) * det in double (r = ratio), i.e. when
 * the larger eigenvalue is less than `ratio` (> 1, finite) times the smaller.
 * dst = feature where kept, 0 elsewhere (also where feature is 0).
 * Checks: pointers -8, size -6, steps -14, windowSize -33, ratio -5.
 * Buffer: (12 * windowSize + 16) * (W + 32) + 8 * W + 256 bytes. */
ZELCV_API ZelStatus ZELCV_CALL zeliLineSuppressionGetBufferSize(ZeliSize roiSize, int windowSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliLineSuppression_8u_C1R(const Zel8u* src, int srcStep, const Zel8u* feature,
                                                          int featureStep, Zel8u* dst, int dstStep,
                                                          ZeliSize roiSize, int windowSize, Zel32f ratio,
                                                          Zel8u* buffer);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_FEATURES_H */
