/* zelcv: Integral images and rectangle statistics.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_INTEGRAL_H
#define ZELCV_INTEGRAL_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Integral images and rectangle statistics -------------------------- */
/* Integral images. For a w x h ROI the plain integral is (w + 1) x (h + 1):
 * row 0 and column 0 hold the start value val, and element (x + 1, y + 1)
 * holds val plus the sum of the source pixels in rows 0..y, columns 0..x.
 * SqrIntegral adds a second image of the same shape holding valSqr plus the
 * sum of the squared pixels. Each row is built from a running sum of the
 * source row (a 32-bit unsigned integer for 8u sources, converted once to the
 * output's floating type; single precision for 32f sources) added to the row
 * above. 32s outputs wrap modulo 2^32; they are never saturated.
 * Limits of the running sums: the plain row sum wraps modulo 2^32 once a
 * row's pixels add up to 2^32 or more (rows of more than 16843009 pixels of
 * 255). The running sum of squares is a 32-bit unsigned integer too, also in
 * the members with double-precision squares (8u32s64f, 8u32f64f), which
 * convert it once per pixel: a row whose squares add up to 2^32 or more
 * (more than 66051 pixels of 255) wraps modulo 2^32 before the conversion;
 * for example a 70000 x 2 ROI of 255 ends its squares plane with 513565408,
 * not 9103500000. Split wider rows into strips.
 * Checks: null src, dst (or sqr) -8; w or h < 1 -6; srcStep < w x source
 * element size, dstStep (sqrStep) < (w + 1) x output element size -14; a
 * step of a 32- or 64-bit image not a multiple of its element size -108
 * (8u source steps are never tested for alignment). The tilted members check
 * the same way with w + 2 output columns. */
ZELCV_API ZelStatus ZELCV_CALL zeliIntegral_8u32s_C1R(const Zel8u* src, int srcStep, Zel32s* dst, int dstStep,
                                                      ZeliSize roiSize, Zel32s val);
ZELCV_API ZelStatus ZELCV_CALL zeliIntegral_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                                      ZeliSize roiSize, Zel32f val);
/* No start value: row 0 and column 0 are 0. */
ZELCV_API ZelStatus ZELCV_CALL zeliIntegral_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                                                    ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliSqrIntegral_8u32s_C1R(const Zel8u* src, int srcStep, Zel32s* dst, int dstStep,
                                                         Zel32s* sqr, int sqrStep, ZeliSize roiSize, Zel32s val,
                                                         Zel32s valSqr);
ZELCV_API ZelStatus ZELCV_CALL zeliSqrIntegral_8u32s64f_C1R(const Zel8u* src, int srcStep, Zel32s* dst,
                                                            int dstStep, Zel64f* sqr, int sqrStep,
                                                            ZeliSize roiSize, Zel32s val, Zel64f valSqr);
ZELCV_API ZelStatus ZELCV_CALL zeliSqrIntegral_8u32f64f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                            int dstStep, Zel64f* sqr, int sqrStep,
                                                            ZeliSize roiSize, Zel32f val, Zel64f valSqr);

/* Tilted (45-degree) integrals: (w + 2) x (h + 2) outputs T, rows 0 and 1
 * holding val. For n >= 2, T[n][x] is val plus the sum of the source pixels
 * (r, c) with r <= n - 2 whose column lies in the upward cone
 * L = x - 1 - (n - 2 - r) <= c <= R = x + (n - 2 - r); the first column
 * (c = 0) is counted only when L <= 0 and L is even, the column just right of
 * the ROI (c = w) only when R >= w and R - w is even, other columns inside
 * the cone always. Each row n is built from rows n - 1 and n - 2:
 * T[n][x] = T[n-1][x-1] - T[n-2][x] + T[n-1][x+1] + src[n-2][x-1] + src[n-2][x],
 * T[n][0] = T[n-1][1], T[n][w+1] = T[n-1][w]. Floating sums are evaluated
 * left to right in double precision and rounded once to the output type.
 *
 * zeliTiltedIntegral_8u32f_C1R: the last column (x = w) of rows 2..h+1 adds
 * the value that the destination already held there (as if that value were
 * the pixel just right of the ROI); clear the destination first for a clean
 * result. zeliTiltedIntegral_8u32s_C1R never reads the destination nor
 * anything right of the ROI: its column w counts no pixel c = w. */
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedIntegral_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                            int dstStep, ZeliSize roiSize, Zel32f val);
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedIntegral_8u32s_C1R(const Zel8u* src, int srcStep, Zel32s* dst,
                                                            int dstStep, ZeliSize roiSize, Zel32s val);
/* Tilted sums and tilted squares, both (w + 2) x (h + 2). These read the
 * source pixel just right of the ROI in every row (src[y][w], counted as the
 * column c = w above): the caller must make it readable. The 32s planes wrap
 * modulo 2^32; 32f and 64f planes are evaluated in double precision
 * (T[n-1][x-1] - T[n-2][x] + T[n-1][x+1] + a + b, left to right, with a and b
 * the two pixels or their squares) and rounded once. Checks: null src, dst or
 * sqr -8; w or h < 1 -6; srcStep < w, dstStep < (w + 2) x element size of the
 * sums, sqrStep < (w + 2) x element size of the squares -14; a 32-bit step
 * not a multiple of 4 or a 64-bit step not a multiple of 8 -108. */
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedSqrIntegral_8u32s_C1R(const Zel8u* src, int srcStep, Zel32s* dst,
                                                               int dstStep, Zel32s* sqr, int sqrStep,
                                                               ZeliSize roiSize, Zel32s val, Zel32s valSqr);
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedSqrIntegral_8u32s64f_C1R(const Zel8u* src, int srcStep, Zel32s* dst,
                                                                  int dstStep, Zel64f* sqr, int sqrStep,
                                                                  ZeliSize roiSize, Zel32s val,
                                                                  Zel64f valSqr);
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedSqrIntegral_8u32f64f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                                  int dstStep, Zel64f* sqr, int sqrStep,
                                                                  ZeliSize roiSize, Zel32f val,
                                                                  Zel64f valSqr);

/* Standard deviation over a sliding rectangle, from an integral (src) and a
 * squared integral (sqr). For each output pixel (x, y) of roiSize the
 * rectangle's corners in the integrals are TL = (x + rect.x, y + rect.y),
 * TR = TL + (rect.width, 0), BL = TL + (0, rect.height) and
 * BR = TL + (rect.width, rect.height); S = (I[TL] - I[TR]) + (I[BR] - I[BL])
 * and Q the same over the squares; with n the rectangle's pixel count,
 * mean = S / n and the result is sqrt(Q / n - mean^2), a negative variance
 * counting as 0. The integrals need w + rect.x + rect.width columns and
 * h + rect.y + rect.height rows.
 *   32f: S in single precision, Q in double; inv = 1 / n in double with n
 *   first converted to single precision; mean = S x inv and
 *   Q x inv - mean^2 in double, rounded to single precision; single square
 *   root.
 *   32s32f: as 32f, with S the exact 32-bit difference (wrapping, so that
 *   wrapped integrals still give the right sum) converted to double.
 *   32s_C1RSfs: both integrals 32s (as zeliSqrIntegral_8u32s_C1R makes them);
 *   S a signed and Q an unsigned 32-bit wrapping difference; the variance is
 *   (n x Q - S^2) / n^2 in double precision (so a constant area gives exactly
 *   0 while n x Q stays below 2^53); the double square root is multiplied by
 *   2^-scaleFactor, rounded to nearest (ties to even) and saturated to
 *   Zel32s. Any scaleFactor is accepted.
 * Checks, in this order: null src, sqr or dst -8; w or h < 1 -6;
 * srcStep < (w + rect.x + rect.width) x element size, dstStep < w x element
 * size or sqrStep < (w + rect.x + rect.width) x element size -14; a step not
 * a multiple of its element size -108; then rect.x < 0, rect.y < 0,
 * rect.width < 1 or rect.height < 1 -6 (the rectangle after the steps). */
ZELCV_API ZelStatus ZELCV_CALL zeliRectStdDev_32f_C1R(const Zel32f* src, int srcStep, const Zel64f* sqr,
                                                      int sqrStep, Zel32f* dst, int dstStep,
                                                      ZeliSize roiSize, ZeliRect rect);
ZELCV_API ZelStatus ZELCV_CALL zeliRectStdDev_32s32f_C1R(const Zel32s* src, int srcStep, const Zel64f* sqr,
                                                         int sqrStep, Zel32f* dst, int dstStep,
                                                         ZeliSize roiSize, ZeliRect rect);
ZELCV_API ZelStatus ZELCV_CALL zeliRectStdDev_32s_C1RSfs(const Zel32s* src, int srcStep, const Zel32s* sqr,
                                                         int sqrStep, Zel32s* dst, int dstStep,
                                                         ZeliSize roiSize, ZeliRect rect, int scaleFactor);
/* The same over a tilted rectangle, from tilted integrals. (rect.x, rect.y)
 * is the rectangle's top corner in the integrals; rect.width runs down to the
 * right and rect.height down to the left, so the corners are
 * top = (x + rect.x, y + rect.y), right = top + (rect.width, rect.width),
 * left = top + (-rect.height, rect.height) and
 * bottom = top + (rect.width - rect.height, rect.width + rect.height), and
 * S = (T[top] - T[right]) + (T[bottom] - T[left]). In source pixels the
 * rectangle's top row is row y + rect.y, columns x + rect.x - 1 and
 * x + rect.x; with (tx, ty) = (x + rect.x, y + rect.y) it holds the pixels
 * (row r, column c) with tx - ty - 2 rect.height + 1 <= c - r <= tx - ty and
 * tx + ty - 1 <= c + r <= tx + ty + 2 rect.width - 2, n = 2 x rect.width x
 * rect.height pixels in rows ty .. ty + rect.width + rect.height - 2.
 * Arithmetic, argument kinds and checks
 * as the upright members, plus rect.x < rect.height -6 (the left corner would
 * lie left of column 0). The integrals need w + rect.x + rect.width columns
 * and h + rect.y + rect.width + rect.height rows. */
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedRectStdDev_32f_C1R(const Zel32f* src, int srcStep, const Zel64f* sqr,
                                                            int sqrStep, Zel32f* dst, int dstStep,
                                                            ZeliSize roiSize, ZeliRect rect);
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedRectStdDev_32s32f_C1R(const Zel32s* src, int srcStep,
                                                               const Zel64f* sqr, int sqrStep, Zel32f* dst,
                                                               int dstStep, ZeliSize roiSize, ZeliRect rect);
ZELCV_API ZelStatus ZELCV_CALL zeliTiltedRectStdDev_32s_C1RSfs(const Zel32s* src, int srcStep,
                                                               const Zel32s* sqr, int sqrStep, Zel32s* dst,
                                                               int dstStep, ZeliSize roiSize, ZeliRect rect,
                                                               int scaleFactor);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_INTEGRAL_H */
