/* zelcv: lens undistortion (radial k1, k2 and tangential p1, p2), the map of
 * source coordinates for callers who undistort many frames with one camera,
 * and bilinear resampling through such a map.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_UNDISTORT_H
#define ZELCV_UNDISTORT_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Camera model ----------------------------------------------------------
 * Destination pixel (j, i) (column j, row i, counted from the first pixel of
 * the ROI) is an ideal, undistorted pinhole image point. Its source position
 * (u, v) in the distorted image is, in single precision, each operation
 * rounded in this order (no fused multiply-add):
 *   x = (j - cx) * (1 / fx)          y = (i - cy) * (1 / fy)
 *   x2 = x * x   y2 = y * y   r2 = x2 + y2   t = (x * y) * 2
 *   kr = (k2 * r2 + k1) * r2 + 1
 *   xd = x * kr + (p1 * t + p2 * (r2 + (x2 + x2)))
 *   yd = y * kr + (p1 * (r2 + (y2 + y2)) + p2 * t)
 *   u = xd * fx + cx                 v = yd * fy + cy
 * j and i are converted to single precision as they are; 1 / fx and 1 / fy
 * are computed once, rounded to single precision. cx, cy are in ROI pixels.
 *
 * ---- Bilinear resampling ---------------------------------------------------
 * A position (u, v) is quantised to 1/32 pixel: X = rint(u * 32),
 * Y = rint(v * 32) as 32-bit integers, ties to even (a NaN, an infinity or a
 * product at or beyond 2^31 in magnitude gives INT_MIN, which lies outside
 * any image). ix = X >> 5, iy = Y >> 5 (floor), fx = X & 31, fy = Y & 31,
 * and the four neighbours weigh
 *   w00 = (32 - fx)(32 - fy)  at (ix, iy)      w01 = fx (32 - fy)  at (ix + 1, iy)
 *   w10 = (32 - fx) fy        at (ix, iy + 1)  w11 = fx fy         at (ix + 1, iy + 1)
 * (sum 1024). A neighbour outside the source (column outside [0, width),
 * row outside [0, height)) reads 0, so a pixel mapped wholly outside gets 0
 * and one on the edge fades toward 0. Per channel:
 *   8u:  (w00 p00 + w01 p01 + w10 p10 + w11 p11 + 512) >> 10 (never above 255);
 *   32f: with W = w / 1024 (exact), ((p00 W00 + p01 W01) + p10 W10) + p11 W11
 *        in single precision; all four products are added, so an infinite
 *        or NaN neighbour of weight 0 still gives NaN.
 *
 * ---- zeliUndistortRadial ---------------------------------------------------
 * dst(j, i) is the source resampled at (u, v) of the camera model; src and
 * dst have the same size roiSize. The result equals
 * zeliCreateMapCameraUndistort followed by zeliRemapBilinear bit for bit.
 * Work buffer (any alignment): zeliUndistortGetSize gives
 * roiSize.width * 8 + 64 bytes (a size beyond INT_MAX gives -6); the same
 * buffer serves every type and channel count of that width.
 * Checks, first failure wins: src, dst or buffer null (-8); width or height
 * < 1 (-6); srcStep or dstStep below width * channels * element size (-14);
 * 32f steps not a multiple of 4 (-108); src equal to dst (-9997); fx or fy
 * zero, or any of the eight parameters infinite or NaN (-5). The images must
 * not overlap. Query: bufferSize null (-8), then width or height < 1 (-6). */
ZELCV_API ZelStatus ZELCV_CALL zeliUndistortGetSize(ZeliSize roiSize, int* bufferSize);

#define ZELI_UNDISTORT(suffix, T)                                                                           \
  ZELCV_API ZelStatus ZELCV_CALL zeliUndistortRadial_##suffix(                                              \
      const T* src, int srcStep, T* dst, int dstStep, ZeliSize roiSize, Zel32f fx, Zel32f fy, Zel32f cx,   \
      Zel32f cy, Zel32f k1, Zel32f k2, Zel32f p1, Zel32f p2, Zel8u* buffer);
ZELI_UNDISTORT(8u_C1R, Zel8u)
ZELI_UNDISTORT(8u_C3R, Zel8u)
ZELI_UNDISTORT(32f_C1R, Zel32f)
ZELI_UNDISTORT(32f_C3R, Zel32f)
#undef ZELI_UNDISTORT

/* ---- zeliCreateMapCameraUndistort ------------------------------------------
 * Writes u into xMap and v into yMap for every pixel of roiSize (the camera
 * model above). camera = {fx, fy, cx, cy}, coefficients = {k1, k2, p1, p2}.
 * Checks: xMap, yMap, camera or coefficients null (-8); width or height < 1
 * (-6); a map step below width * 4 (-14) or not a multiple of 4 (-108); the
 * parameters as for zeliUndistortRadial (-5). The maps must not overlap. */
ZELCV_API ZelStatus ZELCV_CALL zeliCreateMapCameraUndistort_32f_C1R(Zel32f* xMap, int xMapStep, Zel32f* yMap,
                                                                  int yMapStep, ZeliSize roiSize,
                                                                  const Zel32f* camera,
                                                                  const Zel32f* coefficients);

/* ---- zeliRemapBilinear -------------------------------------------------------
 * dst(j, i) is src resampled at (xMap(j, i), yMap(j, i)) as described above;
 * the source is srcSize pixels, the maps and the destination roiSize.
 * Checks: src, xMap, yMap or dst null (-8); srcSize, then roiSize, with a
 * width or height < 1 (-6); srcStep below srcSize.width * channels *
 * element size, a map step below roiSize.width * 4 or dstStep below the
 * destination row bytes, in argument order (-14); a map step, or a 32f
 * image step, not a multiple of 4 (-108); src equal to dst (-9997). The
 * destination must not overlap the source or the maps. */
#define ZELI_REMAP(suffix, T)                                                                                \
  ZELCV_API ZelStatus ZELCV_CALL zeliRemapBilinear_##suffix(const T* src, int srcStep, ZeliSize srcSize,     \
                                                          const Zel32f* xMap, int xMapStep, const Zel32f* yMap, \
                                                          int yMapStep, T* dst, int dstStep, ZeliSize roiSize);
ZELI_REMAP(8u_C1R, Zel8u)
ZELI_REMAP(8u_C3R, Zel8u)
ZELI_REMAP(32f_C1R, Zel32f)
ZELI_REMAP(32f_C3R, Zel32f)
#undef ZELI_REMAP

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_UNDISTORT_H */
