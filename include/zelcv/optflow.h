/* zelcv: pyramidal Lucas-Kanade optical flow.
 * Part of the public interface; "zelcv.h" includes every family.
 *
 * The tracker follows points from a first image to a second one. Both come
 * as pyramid records (zelcv/pyramid.h) whose images[], steps[] and
 * roiSizes[] the caller has filled for levels 0 .. maxLev; level L is read
 * as a w x h image of the call's element type (8u, 16u or 32f) at
 * images[L] with row step steps[L], and the level's scale s is
 * pyramid1->scales[L]. Points are in level-0 pixel coordinates.
 *
 * State. zeliOpticalFlowPyrLKInitAlloc_* keeps roiSize (the largest level
 * whose derivative images fit the state), winSize, hint (stored, changes
 * nothing) and one work block of
 *     ((winSize * 12 + 36) * (winSize + 3) + F + 3 * (W + 5) * (H + 5)) * 4 + 36
 * bytes, with (W, H) = roiSize and F = 32 (W + 5) + 288, the work-buffer size
 * of the 32f Scharr filters (zelcv/filters.h) for a (W + 5)-wide image.
 * Checks: state null -8; width, height or winSize < 1 -6; an allocation
 * failing (or a block beyond INT_MAX bytes) -9, with nothing left
 * allocated and *state untouched. Any of the three Free functions releases
 * any of the states (null gives -8); the states of the three element types
 * are alike.
 *
 * Tracking call. Checks, first failure wins:
 *   -8   pyramid1, pyramid2, prevPts, nextPts, status, error or state null;
 *   -6   numFeat < 1, winSize < 1 or winSize != the state's;
 *   -5   maxLev < 0, maxIter < 1, threshold < 0 or NaN, or maxLev above
 *        126 (status must hold maxLev + 1) or above either pyramid's level;
 *   then each pyramid, for L = 0 .. maxLev: its images, roiSizes, scales or
 *   steps array null, or images[L] null, -8; a level side < 1 -6; steps[L]
 *   below the row bytes -14; a 16u or 32f step not a multiple of the element
 *   size -108. Nothing is written on failure.
 *
 * Algorithm. status[i] = maxLev + 1 for every point; t2 = threshold^2 (in
 * double). For L = maxLev down to 0:
 *   Derivatives of pyramid1's level L: Ix = ScharrVert / 32, Iy =
 *   ScharrHoriz / 32, 3x3 with replicated borders (8u and 16u: the exact
 *   integer sums times 1/32; 32f: the single-precision results of the 32f
 *   Scharr filters times 1/32). They are computed for the whole level when
 *   it fits the state's roiSize; otherwise per point, see below.
 *   For each point i with status[i] == L + 1, in index order:
 *     status[i] = L; p = prevPts[i] * s, g = nextPts[i] * s (products in
 *     double, rounded to float). N = winSize.
 *     Windows: an N x N window centred on a point c has its first pixel at
 *     c - (N - 1) / 2 and is read by bilinear interpolation exactly as
 *     zeliCopySubpixIntersect_*32f_C1R reads it (single precision, clamped
 *     taps), together with its inside rectangle (the pixels that needed no
 *     clamped tap). The first image's window I, Ix and Iy are read at p once
 *     per level (rectangle RI; empty when p is not finite or the window has
 *     no inside pixel).
 *     Iterations k = 0, 1, ...:
 *       the second image's window J at g with its rectangle RJ; when g is not
 *       finite or RJ is empty the point is lost;
 *       R = RI intersected with RJ; when empty, nextPts[i] = g / s and the
 *       point is lost;
 *       over R, with d = I - J in single precision:
 *         Gxx = sum Ix Ix, Gxy = sum Ix Iy, Gyy = sum Iy Iy (only when R
 *         differs from the previous iteration's), bx = sum d Ix,
 *         by = sum d Iy, e = sum d d;
 *       every product in double of the float operands; the sums run in four
 *       lanes, lane c taking the columns x with (x - R.x) mod 4 == c, rows
 *       top to bottom and columns left to right, and end as
 *       (lane0 + lane1) + (lane2 + lane3);
 *       det = Gxx Gyy - Gxy^2; det < 2.220446049250313e-16 (or NaN):
 *       lost;
 *       dx = (Gyy bx - Gxy by) / det, dy = (Gxx by - Gxy bx) / det;
 *       g = g + (dx, dy) (in double, rounded to float);
 *       dx^2 + dy^2 < t2: stop;
 *       from k = 1 on, when |dx + dx'| and |dy + dy'| are both below
 *       0.0003452669770922512, with (dx', dy') the previous step: the step
 *       undid the previous one, g = g - (dx, dy) / 2, stop;
 *       otherwise stop when k + 1 == maxIter.
 *     Result: L == 0: status[i] = 0, nextPts[i] = g; L > 0: nextPts[i] =
 *     g / s (double, rounded to float). error[i] = sqrt(e / (R.width *
 *     R.height)) of the last iteration (float of the double root) when
 *     e > 0, else 0.
 *   A lost point keeps status[i] = L + 1 (no lower level processes it),
 *   error[i] = 0, and nextPts[i] as last stored (except as said above).
 * Per-point derivatives (a level wider or taller than the state's
 * roiSize): the first image's (N + 2) x (N + 2) window around the same
 * centre is read (same weights, first pixel one up and left), and inside it
 *   Ix = ((3 h[y-1] + 10 h[y]) + 3 h[y+1]) * (1/32), h[r] = m[r][x+1] - m[r][x-1],
 *   Iy = (v[y+1] - v[y-1]) * (1/32), v[r] = (3 m[r][x-1] + 10 m[r][x]) + 3 m[r][x+1],
 * in single precision; the rest is as above. Away from the level's edges
 * both routes agree to rounding.
 * A losing point is not an error: the call returns 0. */
#ifndef ZELCV_OPTFLOW_H
#define ZELCV_OPTFLOW_H

#include "zelcv/base.h"
#include "zelcv/pyramid.h"

#ifdef __cplusplus
extern "C" {
#endif

typedef struct ZeliOptFlowPyrLKState ZeliOptFlowPyrLKState;

#define ZELI_OPTFLOW(suffix)                                                                                   \
  ZELCV_API ZelStatus ZELCV_CALL zeliOpticalFlowPyrLKInitAlloc_##suffix(ZeliOptFlowPyrLKState** state,         \
                                                                      ZeliSize roiSize, int winSize, int hint); \
  ZELCV_API ZelStatus ZELCV_CALL zeliOpticalFlowPyrLKFree_##suffix(ZeliOptFlowPyrLKState* state);              \
  ZELCV_API ZelStatus ZELCV_CALL zeliOpticalFlowPyrLK_##suffix(                                                \
      const ZeliPyramid* pyramid1, const ZeliPyramid* pyramid2, const ZeliPoint_32f* prevPts,                  \
      ZeliPoint_32f* nextPts, Zel8s* status, Zel32f* error, int numFeat, int winSize, int maxLev, int maxIter,  \
      Zel32f threshold, ZeliOptFlowPyrLKState* state);
ZELI_OPTFLOW(8u_C1R)
ZELI_OPTFLOW(16u_C1R)
ZELI_OPTFLOW(32f_C1R)
#undef ZELI_OPTFLOW

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_OPTFLOW_H */
